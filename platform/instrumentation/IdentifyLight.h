// The identify light as a source reads it, and the blue-light node made of it. Every source of
// identify lights (a BMC over IPMI or Redfish, an enclosure's drive bays) reads an off/on state
// or fails to, and all of them turn that into a node the same way, so that a client sees the
// same AlarmState, status and health whatever the light's source. Pure functions.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_IDENTIFYLIGHT_H
#define KESTA_PLATFORM_INSTRUMENTATION_IDENTIFYLIGHT_H

#include <string>

#include "instrumentation/InstrumentationSource.h"

namespace Kesta {
namespace platform {

// The node status of a light whose state could not be read (the module shows it as degraded).
constexpr unsigned int kIdentifyStatusUnreadable = 21;

enum class IdentifyState {
  Off,
  TimedOn,  // on for an interval the controller counts down
  IndefinitelyOn
};

// The identify light as one reading describes it.
struct IdentifyReading {
  enum class Kind {
    Known,        // `state` holds the state
    NotReported,  // the controller answered but does not report an identify state
    Unusable      // the reading cannot be used; `problem` says why
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

// How a light that is on is reported: identify lights blink, so "alternating" is the default;
// lights that glow steadily are configured as "steady".
enum class OnReport { Alternating, Steady };

// The alarm state (node property 1) for a known state: 1 off, 3 alternating or 2 steady on.
unsigned int identifyAlarmState(IdentifyState state, OnReport onReport);

// The blue-light node of one identify light:
//   Known        -> status 1 and property 1 (identifyAlarmState)
//   NotReported  -> status 0, no property
//   Unusable     -> status 21 (degraded), no property
InstrumentationNode identifyNode(const IdentifyReading& reading, const std::string& path,
                                 const std::string& description, OnReport onReport);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_IDENTIFYLIGHT_H
