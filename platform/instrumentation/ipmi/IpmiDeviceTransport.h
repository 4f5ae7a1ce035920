// The in-band transport: the Linux IPMI device (/dev/ipmi0, from the ipmi_devintf module),
// driven with the IPMICTL_SEND_COMMAND and IPMICTL_RECEIVE_MSG_TRUNC ioctls. No library.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMIDEVICETRANSPORT_H
#define KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMIDEVICETRANSPORT_H

#include <poll.h>

#include <memory>
#include <string>

#include "instrumentation/ipmi/IpmiTransport.h"
#include "os/Clock.h"

namespace Kesta {
namespace platform {

constexpr const char* kDefaultIpmiDevice = "/dev/ipmi0";

// The system calls the in-band transport makes, behind an interface so that tests can stand in
// for the kernel. Each returns what the system call returns on success, and the negated errno
// value on failure (-ENOENT, -EINTR, ...), so no errno is carried between calls.
class IpmiDeviceOs {
 public:
  IpmiDeviceOs() = default;
  virtual ~IpmiDeviceOs();
  IpmiDeviceOs(const IpmiDeviceOs&) = delete;
  IpmiDeviceOs& operator=(const IpmiDeviceOs&) = delete;

  virtual int open(const char* path, int flags) = 0;
  virtual int close(int fd) = 0;
  virtual int ioctl(int fd, unsigned long request, void* argument) = 0;
  virtual int poll(struct pollfd* fds, nfds_t count, int timeoutMilliseconds) = 0;
};

// The real system calls.
std::shared_ptr<IpmiDeviceOs> systemIpmiDeviceOs();

class IpmiDeviceTransport final : public IpmiTransport {
 public:
  // The deadline is measured by `clock`; every poll() waits at most the time left by it.
  explicit IpmiDeviceTransport(std::string device,
                               std::shared_ptr<IpmiDeviceOs> os = systemIpmiDeviceOs(),
                               std::shared_ptr<const Clock> clock = steadyClock());

  // Opens the device for this one request (so concurrent readers never share a descriptor or
  // see each other's answers), sends the request to the BMC over the system interface, and
  // waits with poll() until the answer with the same message id arrives or the deadline passes.
  // Anything else that arrives (an answer to an older request, an event) is passed over.
  IpmiResponse transact(const IpmiRequest& request, IpmiClock::time_point deadline) const override;

 private:
  std::string device_;
  std::shared_ptr<IpmiDeviceOs> os_;
  std::shared_ptr<const Clock> clock_;
};

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMIDEVICETRANSPORT_H
