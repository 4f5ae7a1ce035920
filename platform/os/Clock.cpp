#include "os/Clock.h"

namespace Kesta {
namespace platform {

namespace {

class SteadyClock final : public Clock {
 public:
  time_point now() const override { return std::chrono::steady_clock::now(); }
};

}  // namespace

Clock::~Clock() = default;

std::shared_ptr<const Clock> steadyClock() {
  static const std::shared_ptr<const Clock> clock = std::make_shared<SteadyClock>();
  return clock;
}

}  // namespace platform
}  // namespace Kesta
