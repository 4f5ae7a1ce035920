#include "instrumentation/ipmi/IpmiIdentify.h"

#include <array>
#include <cstdio>

namespace Kesta {
namespace platform {

namespace {

constexpr std::uint8_t kCompletionOk = 0x00;
// Completion code, power state, last power event, misc chassis state.
constexpr std::size_t kShortestAnswer = 4;
constexpr std::size_t kMiscByte = 3;
constexpr std::uint8_t kIdentifyReported = 0x40;
constexpr unsigned int kIdentifyShift = 4;
constexpr std::uint8_t kIdentifyMask = 0x03;

struct NamedCode {
  std::uint8_t code;
  const char* meaning;
};

// The generic completion codes every BMC may return; command-specific ones (80h-BEh) and OEM
// ones have no general meaning and are shown as numbers.
constexpr std::array<NamedCode, 24> kCompletionCodes = {{
    {0xC0, "node busy"},
    {0xC1, "invalid command"},
    {0xC2, "command invalid for the given LUN"},
    {0xC3, "timeout while processing the command"},
    {0xC4, "out of space"},
    {0xC5, "reservation cancelled or invalid"},
    {0xC6, "request data truncated"},
    {0xC7, "request data length invalid"},
    {0xC8, "request data field length limit exceeded"},
    {0xC9, "parameter out of range"},
    {0xCA, "cannot return the number of requested data bytes"},
    {0xCB, "requested sensor, data or record not present"},
    {0xCC, "invalid data field in the request"},
    {0xCD, "command illegal for the sensor or record type"},
    {0xCE, "command response could not be provided"},
    {0xCF, "cannot execute a duplicated request"},
    {0xD0, "SDR repository in update mode"},
    {0xD1, "device in firmware update mode"},
    {0xD2, "BMC initialization in progress"},
    {0xD3, "destination unavailable"},
    {0xD4, "insufficient privilege level"},
    {0xD5, "command not supported in the present state"},
    {0xD6, "command sub-function disabled or unavailable"},
    {0xFF, "unspecified error"},
}};

}  // namespace

std::string completionCodeText(std::uint8_t code) {
  char number[8] = {};
  std::snprintf(number, sizeof number, "%02Xh", static_cast<unsigned int>(code));
  for (const NamedCode& named : kCompletionCodes) {
    if (named.code == code) {
      return std::string(number) + " (" + named.meaning + ")";
    }
  }
  return number;
}

IdentifyReading decodeChassisStatus(const std::uint8_t* answer, std::size_t size) {
  if (size == 0 || answer == nullptr) {
    return IdentifyReading::unusable("the answer to Get Chassis Status is empty");
  }
  if (answer[0] != kCompletionOk) {
    return IdentifyReading::unusable("Get Chassis Status failed with completion code " +
                                     completionCodeText(answer[0]));
  }
  if (size < kShortestAnswer) {
    return IdentifyReading::unusable("the answer to Get Chassis Status is too short (" +
                                     std::to_string(size) + " bytes, at least " +
                                     std::to_string(kShortestAnswer) + " expected)");
  }
  const std::uint8_t misc = answer[kMiscByte];
  if ((misc & kIdentifyReported) == 0) {
    return IdentifyReading::notReported();
  }
  switch ((misc >> kIdentifyShift) & kIdentifyMask) {
    case 0:
      return IdentifyReading::known(IdentifyState::Off);
    case 1:
      return IdentifyReading::known(IdentifyState::TimedOn);
    case 2:
      return IdentifyReading::known(IdentifyState::IndefinitelyOn);
    default:
      return IdentifyReading::unusable(
          "Get Chassis Status reports the reserved identify state 11b");
  }
}

}  // namespace platform
}  // namespace Kesta
