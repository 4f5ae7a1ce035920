// How an IPMI source reaches its BMC: one request out, one answer back, within a deadline.
// The in-band transport talks to the Linux IPMI device; the network transport (RMCP+) to a
// BMC over the LAN through the separately built plug-in.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMITRANSPORT_H
#define KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMITRANSPORT_H

#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

namespace Kesta {
namespace platform {

// The type of the deadlines. Nothing reads this clock directly: the source and the transports
// measure deadlines by the Clock they were given (os/Clock.h), whose time points are these.
using IpmiClock = std::chrono::steady_clock;

struct IpmiRequest {
  std::uint8_t netFn = 0;
  std::uint8_t command = 0;
  std::vector<std::uint8_t> data;
};

// The outcome of one request. Failures to deliver or to get an answer are outcomes, not
// exceptions: a BMC that does not answer is an everyday event for a reader of its state.
struct IpmiResponse {
  bool answered = false;
  std::vector<std::uint8_t> data;  // when answered: the completion code, then the data
  std::string failure;             // when not answered: why, in words (no credentials)
  // The deadline passed first. `failure` then says what did not happen ("no answer from the
  // BMC"); the source adds the timeout it configured, which the transport does not know.
  bool timedOut = false;

  static IpmiResponse answer(std::vector<std::uint8_t> data) {
    return {true, std::move(data), {}, false};
  }
  static IpmiResponse failed(std::string why) { return {false, {}, std::move(why), false}; }
  static IpmiResponse timeout(std::string what) { return {false, {}, std::move(what), true}; }
};

class IpmiTransport {
 public:
  IpmiTransport() = default;
  virtual ~IpmiTransport();
  IpmiTransport(const IpmiTransport&) = delete;
  IpmiTransport& operator=(const IpmiTransport&) = delete;

  // Sends `request` to the BMC and waits for its answer, but not past `deadline`, whatever the
  // BMC or the operating system does. Safe to call from several threads at once.
  virtual IpmiResponse transact(const IpmiRequest& request,
                                IpmiClock::time_point deadline) const = 0;
};

// Milliseconds as a readable duration for log lines: "1000 ms", "250 ms".
std::string millisecondsText(std::chrono::milliseconds duration);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMITRANSPORT_H
