#include "instrumentation/ipmi/IpmiDeviceTransport.h"

#include <fcntl.h>
#include <linux/ipmi.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <cerrno>

#include "os/FileIo.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

class SystemIpmiDeviceOs final : public IpmiDeviceOs {
 public:
  int open(const char* path, int flags) override {
    const int fd = ::open(path, flags);
    return fd >= 0 ? fd : -errno;
  }
  int close(int fd) override { return ::close(fd) == 0 ? 0 : -errno; }
  int ioctl(int fd, unsigned long request, void* argument) override {
    const int result = ::ioctl(fd, request, argument);
    return result >= 0 ? result : -errno;
  }
  int poll(struct pollfd* fds, nfds_t count, int timeoutMilliseconds) override {
    const int result = ::poll(fds, count, timeoutMilliseconds);
    return result >= 0 ? result : -errno;
  }
};

// Closes through the seam, so a test sees every descriptor it handed out come back.
class DeviceFd {
 public:
  DeviceFd(IpmiDeviceOs& os, int fd) : os_(os), fd_(fd) {}
  ~DeviceFd() {
    if (fd_ >= 0) {
      os_.close(fd_);
    }
  }
  DeviceFd(const DeviceFd&) = delete;
  DeviceFd& operator=(const DeviceFd&) = delete;
  int get() const { return fd_; }

 private:
  IpmiDeviceOs& os_;
  int fd_;
};

// Message ids only need to tell this process's requests apart on one descriptor; a counter
// shared by all threads does that without a lock.
std::atomic<long> nextMessageId{1};

// Room for the largest answer the driver delivers; anything longer is cut by the TRUNC ioctl.
constexpr std::size_t kAnswerBuffer = 272;

int millisecondsUntil(const Clock& clock, IpmiClock::time_point deadline) {
  const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - clock.now());
  return left.count() <= 0 ? 0 : static_cast<int>(left.count());
}

}  // namespace

IpmiDeviceOs::~IpmiDeviceOs() = default;

std::shared_ptr<IpmiDeviceOs> systemIpmiDeviceOs() {
  static const std::shared_ptr<IpmiDeviceOs> os = std::make_shared<SystemIpmiDeviceOs>();
  return os;
}

IpmiDeviceTransport::IpmiDeviceTransport(std::string device, std::shared_ptr<IpmiDeviceOs> os,
                                         std::shared_ptr<const Clock> clock)
    : device_(std::move(device)), os_(std::move(os)), clock_(std::move(clock)) {}

IpmiResponse IpmiDeviceTransport::transact(const IpmiRequest& request,
                                           IpmiClock::time_point deadline) const {
  const std::string device = printable(device_);

  int opened = os_->open(device_.c_str(), O_RDWR | O_CLOEXEC | O_NONBLOCK);
  if (opened < 0) {
    std::string why = "cannot open " + device + ": " + errorText(-opened);
    if (opened == -ENOENT) {
      why += " (is the ipmi_devintf kernel module loaded?)";
    }
    return IpmiResponse::failed(why);
  }
  const DeviceFd fd(*os_, opened);

  // The BMC itself, reached through the system interface.
  ipmi_system_interface_addr address = {};
  address.addr_type = IPMI_SYSTEM_INTERFACE_ADDR_TYPE;
  address.channel = IPMI_BMC_CHANNEL;
  address.lun = 0;
  std::vector<std::uint8_t> requestData = request.data;
  ipmi_req message = {};
  message.addr = reinterpret_cast<unsigned char*>(&address);
  message.addr_len = sizeof address;
  message.msgid = nextMessageId.fetch_add(1, std::memory_order_relaxed);
  message.msg.netfn = request.netFn;
  message.msg.cmd = request.command;
  message.msg.data_len = static_cast<unsigned short>(requestData.size());
  message.msg.data = requestData.empty() ? nullptr : requestData.data();

  int sent = 0;
  do {
    sent = os_->ioctl(fd.get(), IPMICTL_SEND_COMMAND, &message);
  } while (sent == -EINTR);
  if (sent < 0) {
    return IpmiResponse::failed("cannot send the request to the BMC through " + device + ": " +
                                errorText(-sent));
  }

  for (;;) {
    const int wait = millisecondsUntil(*clock_, deadline);
    if (wait == 0) {
      return IpmiResponse::timeout("no answer from the BMC");
    }
    struct pollfd ready = {fd.get(), POLLIN, 0};
    const int polled = os_->poll(&ready, 1, wait);
    if (polled == -EINTR || polled == 0) {
      continue;
    }
    if (polled < 0) {
      return IpmiResponse::failed("cannot wait for the answer on " + device + ": " +
                                  errorText(-polled));
    }
    if ((ready.revents & POLLIN) == 0) {
      return IpmiResponse::failed("cannot wait for the answer on " + device +
                                  ": the device reports an error");
    }

    std::array<unsigned char, kAnswerBuffer> data = {};
    ipmi_addr from = {};
    ipmi_recv received = {};
    received.addr = reinterpret_cast<unsigned char*>(&from);
    received.addr_len = sizeof from;
    received.msg.data = data.data();
    received.msg.data_len = static_cast<unsigned short>(data.size());
    const int got = os_->ioctl(fd.get(), IPMICTL_RECEIVE_MSG_TRUNC, &received);
    if (got == -EAGAIN || got == -EINTR) {
      continue;  // woken without a message (or by a signal): wait again
    }
    // With the TRUNC variant EMSGSIZE means the message was delivered, cut to the buffer.
    if (got < 0 && got != -EMSGSIZE) {
      return IpmiResponse::failed("cannot receive the answer from " + device + ": " +
                                  errorText(-got));
    }
    if (received.recv_type != IPMI_RESPONSE_RECV_TYPE || received.msgid != message.msgid) {
      continue;
    }
    if (received.msg.netfn != (request.netFn | 1u) || received.msg.cmd != request.command) {
      return IpmiResponse::failed("the BMC answered another command (NetFn " +
                                  std::to_string(received.msg.netfn) + ", command " +
                                  std::to_string(received.msg.cmd) + ")");
    }
    const std::size_t length = std::min<std::size_t>(received.msg.data_len, data.size());
    return IpmiResponse::answer(std::vector<std::uint8_t>(data.begin(), data.begin() + length));
  }
}

}  // namespace platform
}  // namespace Kesta
