// The clock the platform measures its deadlines by, behind an interface.
//
// Why this seam exists: a read of a BMC must end at its deadline whatever the BMC does, and the
// tests must show that it does. Measured against the real clock they could only show it within a
// window of wall time, and a loaded machine or a sanitizer moves any such window. So the code that
// computes deadlines and the time left until them takes a Clock by injection, with steadyClock()
// as the default, and tests hand in one that moves only when the code waits
// (tests/platform/support/ManualClock.h): the transport then gives up exactly at its deadline,
// and a test can say so.
//
// Nothing here waits. The in-band IPMI transport waits in poll() through its IpmiDeviceOs, for
// the time left by this clock, so a test's stand-in for poll() advances the test clock instead of
// sleeping; the network transport hands the time left to its plug-in, which waits on its own.
#ifndef KESTA_PLATFORM_OS_CLOCK_H
#define KESTA_PLATFORM_OS_CLOCK_H

#include <chrono>
#include <memory>

namespace Kesta {
namespace platform {

class Clock {
 public:
  // The steady clock's own types, so that a deadline means the same whichever clock made it.
  using duration = std::chrono::steady_clock::duration;
  using time_point = std::chrono::steady_clock::time_point;

  Clock() = default;
  virtual ~Clock();
  Clock(const Clock&) = delete;
  Clock& operator=(const Clock&) = delete;

  // Safe to call from several threads at once.
  virtual time_point now() const = 0;
};

// std::chrono::steady_clock. Stateless, so one instance serves the whole process.
std::shared_ptr<const Clock> steadyClock();

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_OS_CLOCK_H
