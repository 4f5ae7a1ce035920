// What a BMC's answer to Get Chassis Status says about the chassis identify light (the node made
// of it is IdentifyLight.h's). Pure functions: no I/O, so every answer can be tested as bytes.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMIIDENTIFY_H
#define KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMIIDENTIFY_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "instrumentation/IdentifyLight.h"

namespace Kesta {
namespace platform {

// The one request the IPMI sources send: Get Chassis Status (NetFn chassis, no data). The
// sources only read; they never send Chassis Identify.
constexpr std::uint8_t kIpmiChassisNetFn = 0x00;
constexpr std::uint8_t kIpmiGetChassisStatus = 0x01;

// The node status of a light whose state could not be read.
constexpr unsigned int kIpmiStatusUnreadable = kIdentifyStatusUnreadable;

// Decodes an answer to Get Chassis Status: the completion code, then current power state, last
// power event and the misc chassis state byte (and optionally more, which is ignored). In the
// misc byte, bit 6 tells whether the identify state is reported and bits 5:4 hold it: 00 off,
// 01 on for an interval, 10 on until switched off. An error completion code, an answer shorter
// than four bytes and the reserved state 11 make the answer unusable: a BMC that reports a state
// no one defined cannot be trusted to have meant any of the others.
IdentifyReading decodeChassisStatus(const std::uint8_t* answer, std::size_t size);
inline IdentifyReading decodeChassisStatus(const std::vector<std::uint8_t>& answer) {
  return decodeChassisStatus(answer.data(), answer.size());
}

// A completion code in words for log lines, e.g. "C1h (invalid command)".
std::string completionCodeText(std::uint8_t code);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMIIDENTIFY_H
