// What a BMC's answer to Get Chassis Status says about the chassis identify light, and the node
// the IPMI sources make of it. Pure functions: no I/O, so every answer can be tested as bytes.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMIIDENTIFY_H
#define KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMIIDENTIFY_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "instrumentation/InstrumentationSource.h"

namespace Kesta {
namespace platform {

// The one request the IPMI sources send: Get Chassis Status (NetFn chassis, no data). The
// sources only read; they never send Chassis Identify.
constexpr std::uint8_t kIpmiChassisNetFn = 0x00;
constexpr std::uint8_t kIpmiGetChassisStatus = 0x01;

// The node status of a light whose state could not be read (the module shows it as degraded).
constexpr unsigned int kIpmiStatusUnreadable = 21;

enum class IdentifyState {
  Off,
  TimedOn,  // on for an interval the BMC counts down
  IndefinitelyOn
};

// The identify light as one answer describes it.
struct IdentifyReading {
  enum class Kind {
    Known,        // `state` holds the state
    NotReported,  // the BMC answered but does not report an identify state
    Unusable      // the answer cannot be used; `problem` says why
  };
  Kind kind = Kind::Unusable;
  IdentifyState state = IdentifyState::Off;
  std::string problem;

  static IdentifyReading known(IdentifyState state) { return {Kind::Known, state, {}}; }
  static IdentifyReading notReported() { return {Kind::NotReported, IdentifyState::Off, {}}; }
  static IdentifyReading unusable(std::string problem) {
    return {Kind::Unusable, IdentifyState::Off, std::move(problem)};
  }
};

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

// How a light that is on is reported: identify lights blink, so "alternating" is the default;
// lights that glow steadily are configured as "steady".
enum class OnReport { Alternating, Steady };

// The alarm state (node property 1) for a known state: 1 off, 3 alternating or 2 steady on.
unsigned int identifyAlarmState(IdentifyState state, OnReport onReport);

// The blue-light node of one BMC:
//   Known        -> status 1 and property 1 (identifyAlarmState)
//   NotReported  -> status 0, no property
//   Unusable     -> status 21 (degraded), no property
InstrumentationNode identifyNode(const IdentifyReading& reading, const std::string& path,
                                 const std::string& description, OnReport onReport);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMIIDENTIFY_H
