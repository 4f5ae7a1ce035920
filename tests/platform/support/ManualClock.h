// A Clock for tests that stands still until it is moved: by the test, or by a stand-in for a
// call that waits (a fake poll() advances it by the time it was asked to wait). Deadlines are
// then met exactly, and a test says where the code gave up instead of measuring it.
#ifndef BLUELIGHT_TESTS_PLATFORM_MANUALCLOCK_H
#define BLUELIGHT_TESTS_PLATFORM_MANUALCLOCK_H

#include <chrono>
#include <mutex>

#include "os/Clock.h"

namespace platform_test {

class ManualClock final : public Kesta::platform::Clock {
 public:
  // Where every ManualClock starts: a fixed point, far enough from the steady clock's epoch that
  // a deadline some seconds in the past is still an ordinary time point.
  static constexpr time_point kStart = time_point(std::chrono::hours(1000));

  time_point now() const override {
    std::lock_guard<std::mutex> lock(mutex_);
    return now_;
  }

  void advance(duration by) {
    std::lock_guard<std::mutex> lock(mutex_);
    now_ += by;
  }

  // Moves on to `when`; a clock that is already past it stays where it is.
  void advanceTo(time_point when) {
    std::lock_guard<std::mutex> lock(mutex_);
    if (when > now_) {
      now_ = when;
    }
  }

  // The time since kStart.
  duration elapsed() const { return now() - kStart; }

 private:
  mutable std::mutex mutex_;
  time_point now_ = kStart;
};

}  // namespace platform_test

#endif  // BLUELIGHT_TESTS_PLATFORM_MANUALCLOCK_H
