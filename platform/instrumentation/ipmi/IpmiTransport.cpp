#include "instrumentation/ipmi/IpmiTransport.h"

namespace Kesta {
namespace platform {

IpmiTransport::~IpmiTransport() = default;

std::string millisecondsText(std::chrono::milliseconds duration) {
  return std::to_string(duration.count()) + " ms";
}

}  // namespace platform
}  // namespace Kesta
