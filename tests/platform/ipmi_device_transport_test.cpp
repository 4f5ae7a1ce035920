// The in-band transport up to the ioctl boundary: a fake stands in for open, ioctl, poll and
// close, plays the kernel's part and records what the transport asked of it. Time is a
// ManualClock that moves only while the fake's poll() "waits", so deadlines are met exactly.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/ipmi.h>
#include <sys/ioctl.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <deque>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "ManualClock.h"
#include "instrumentation/ipmi/IpmiDeviceTransport.h"

namespace {

using namespace std::chrono_literals;
using Kesta::platform::IpmiClock;
using Kesta::platform::IpmiDeviceOs;
using Kesta::platform::IpmiDeviceTransport;
using Kesta::platform::IpmiRequest;
using Kesta::platform::IpmiResponse;
using platform_test::ManualClock;

using Bytes = std::vector<std::uint8_t>;

const IpmiRequest kGetChassisStatus{0x00, 0x01, {}};

// The kernel as the transport sees it. Every member is guarded by the one mutex, so several
// threads may use one fake.
class FakeKernel final : public IpmiDeviceOs {
 public:
  struct Sent {
    int fd = -1;
    int addressType = 0;
    int channel = 0;
    int lun = -1;
    unsigned int addressLength = 0;
    long msgid = 0;
    std::uint8_t netFn = 0;
    std::uint8_t command = 0;
    Bytes data;
  };
  struct Incoming {
    int result = 0;  // what the receive ioctl returns (0, -EAGAIN, -EMSGSIZE, -EIO, ...)
    int recvType = IPMI_RESPONSE_RECV_TYPE;
    std::optional<long> msgid;  // none: the id of the request sent on that descriptor
    std::uint8_t netFn = 0x01;
    std::uint8_t command = 0x01;
    Bytes data;
  };
  struct PollStep {
    int result = 1;
    short revents = POLLIN;
    std::chrono::milliseconds spent{0};  // how long the call took before it returned
  };

  // What the calls do; set before the transport runs.
  int openError = 0;               // a negated errno for open, or 0
  std::deque<int> sendResults;     // per send (empty: success)
  std::deque<PollStep> pollSteps;  // per poll (empty: wait the whole timeout and report none)
  std::deque<Incoming> incoming;   // per receive (empty: -EAGAIN)
  // When set, every poll is ready at once and every receive answers the request on that
  // descriptor with this function's bytes (for the concurrency test).
  std::function<Bytes(int fd)> answerEveryRequest;
  // The clock the transport measures its deadline by; a poll() moves it by the time it waits.
  std::shared_ptr<ManualClock> clock;

  int open(const char* path, int flags) override {
    std::lock_guard<std::mutex> lock(mutex_);
    openedPaths.emplace_back(path);
    openFlags.push_back(flags);
    if (openError != 0) {
      return openError;
    }
    const int fd = nextFd_++;
    openFds.insert(fd);
    return fd;
  }

  int close(int fd) override {
    std::lock_guard<std::mutex> lock(mutex_);
    closed.push_back(fd);
    openFds.erase(fd);
    return 0;
  }

  int ioctl(int fd, unsigned long request, void* argument) override {
    std::lock_guard<std::mutex> lock(mutex_);
    requests.push_back(request);
    if (request == IPMICTL_SEND_COMMAND) {
      return send(fd, *static_cast<ipmi_req*>(argument));
    }
    if (request == IPMICTL_RECEIVE_MSG_TRUNC) {
      return receive(fd, *static_cast<ipmi_recv*>(argument));
    }
    return -ENOTTY;
  }

  int poll(struct pollfd* fds, nfds_t count, int timeoutMilliseconds) override {
    std::unique_lock<std::mutex> lock(mutex_);
    pollTimeouts.push_back(timeoutMilliseconds);
    EXPECT_EQ(count, 1u);
    EXPECT_EQ(fds[0].events & POLLIN, POLLIN);
    if (answerEveryRequest) {
      fds[0].revents = POLLIN;
      return 1;
    }
    if (pollSteps.empty()) {
      clock->advance(std::chrono::milliseconds(timeoutMilliseconds));
      return 0;
    }
    const PollStep step = pollSteps.front();
    pollSteps.pop_front();
    clock->advance(step.spent);
    fds[0].revents = step.revents;
    return step.result;
  }

  std::vector<std::string> openedPaths;
  std::vector<int> openFlags;
  std::vector<unsigned long> requests;
  std::vector<Sent> sent;
  std::vector<int> closed;
  std::set<int> openFds;
  std::vector<int> pollTimeouts;

 private:
  int send(int fd, const ipmi_req& request) {
    Sent record;
    record.fd = fd;
    record.addressLength = request.addr_len;
    if (request.addr != nullptr && request.addr_len >= sizeof(ipmi_system_interface_addr)) {
      const auto* address = reinterpret_cast<const ipmi_system_interface_addr*>(request.addr);
      record.addressType = address->addr_type;
      record.channel = address->channel;
      record.lun = address->lun;
    }
    record.msgid = request.msgid;
    record.netFn = request.msg.netfn;
    record.command = request.msg.cmd;
    record.data.assign(request.msg.data, request.msg.data + request.msg.data_len);
    sent.push_back(record);
    lastMsgid_[fd] = request.msgid;
    if (sendResults.empty()) {
      return 0;
    }
    const int result = sendResults.front();
    sendResults.pop_front();
    return result;
  }

  int receive(int fd, ipmi_recv& message) {
    Incoming next;
    if (answerEveryRequest) {
      next.data = answerEveryRequest(fd);
    } else if (incoming.empty()) {
      return -EAGAIN;
    } else {
      next = incoming.front();
      incoming.pop_front();
    }
    if (next.result != 0 && next.result != -EMSGSIZE) {
      return next.result;
    }
    message.recv_type = next.recvType;
    message.msgid = next.msgid.value_or(lastMsgid_[fd]);
    message.msg.netfn = next.netFn;
    message.msg.cmd = next.command;
    const std::size_t length = std::min<std::size_t>(next.data.size(), message.msg.data_len);
    std::copy_n(next.data.begin(), length, message.msg.data);
    message.msg.data_len = static_cast<unsigned short>(length);
    return next.result;
  }

  std::mutex mutex_;
  int nextFd_ = 40;
  std::map<int, long> lastMsgid_;
};

// A receive that fails with `error` (a negated errno value).
FakeKernel::Incoming failedReceive(int error) {
  FakeKernel::Incoming incoming;
  incoming.result = error;
  return incoming;
}

class IpmiDeviceTransportTest : public ::testing::Test {
 protected:
  IpmiDeviceTransportTest() { kernel_->clock = clock_; }

  IpmiResponse ask(IpmiClock::duration timeout = 1000ms,
                   const IpmiRequest& request = kGetChassisStatus) {
    const IpmiDeviceTransport transport("/dev/ipmi0", kernel_, clock_);
    return transport.transact(request, clock_->now() + timeout);
  }

  // Every descriptor the transport opened was closed again, once.
  void expectEverythingClosed() {
    EXPECT_TRUE(kernel_->openFds.empty());
    EXPECT_EQ(kernel_->closed.size(), kernel_->openedPaths.size() - (kernel_->openError ? 1 : 0));
  }

  std::shared_ptr<ManualClock> clock_ = std::make_shared<ManualClock>();
  std::shared_ptr<FakeKernel> kernel_ = std::make_shared<FakeKernel>();
};

TEST_F(IpmiDeviceTransportTest, SendsGetChassisStatusToTheBmcAndReturnsTheAnswer) {
  kernel_->pollSteps = {{}};
  kernel_->incoming = {
      {0, IPMI_RESPONSE_RECV_TYPE, std::nullopt, 0x01, 0x01, {0x00, 0x01, 0x00, 0x60}}};
  const IpmiResponse response = ask();
  ASSERT_TRUE(response.answered) << response.failure;
  EXPECT_EQ(response.data, (Bytes{0x00, 0x01, 0x00, 0x60}));

  ASSERT_EQ(kernel_->openedPaths, std::vector<std::string>{"/dev/ipmi0"});
  EXPECT_EQ(kernel_->openFlags[0] & O_ACCMODE, O_RDWR);
  EXPECT_NE(kernel_->openFlags[0] & O_CLOEXEC, 0);
  EXPECT_EQ(kernel_->requests,
            (std::vector<unsigned long>{IPMICTL_SEND_COMMAND, IPMICTL_RECEIVE_MSG_TRUNC}));
  ASSERT_EQ(kernel_->sent.size(), 1u);
  const FakeKernel::Sent& sent = kernel_->sent[0];
  EXPECT_EQ(sent.addressType, IPMI_SYSTEM_INTERFACE_ADDR_TYPE);
  EXPECT_EQ(sent.channel, IPMI_BMC_CHANNEL);
  EXPECT_EQ(sent.lun, 0);
  EXPECT_EQ(sent.addressLength, sizeof(ipmi_system_interface_addr));
  EXPECT_EQ(sent.netFn, 0x00);
  EXPECT_EQ(sent.command, 0x01);
  EXPECT_TRUE(sent.data.empty());
  ASSERT_EQ(kernel_->pollTimeouts.size(), 1u);
  EXPECT_GT(kernel_->pollTimeouts[0], 0);
  EXPECT_LE(kernel_->pollTimeouts[0], 1000);
  expectEverythingClosed();
}

TEST_F(IpmiDeviceTransportTest, PassesRequestDataAndOtherDevices) {
  kernel_->pollSteps = {{}};
  kernel_->incoming = {{0, IPMI_RESPONSE_RECV_TYPE, std::nullopt, 0x07, 0x01, {0x00, 0x20}}};
  const IpmiDeviceTransport transport("/dev/ipmi3", kernel_, clock_);
  const IpmiResponse response = transport.transact({0x06, 0x01, {0xaa, 0xbb}}, clock_->now() + 1s);
  ASSERT_TRUE(response.answered) << response.failure;
  EXPECT_EQ(kernel_->openedPaths, std::vector<std::string>{"/dev/ipmi3"});
  EXPECT_EQ(kernel_->sent.at(0).netFn, 0x06);
  EXPECT_EQ(kernel_->sent.at(0).data, (Bytes{0xaa, 0xbb}));
}

TEST_F(IpmiDeviceTransportTest, EveryRequestHasItsOwnMessageId) {
  for (int i = 0; i < 3; ++i) {
    kernel_->pollSteps.push_back({});
    kernel_->incoming.push_back({0, IPMI_RESPONSE_RECV_TYPE, std::nullopt, 1, 1, {0, 1, 0, 0x40}});
    ASSERT_TRUE(ask().answered);
  }
  ASSERT_EQ(kernel_->sent.size(), 3u);
  EXPECT_NE(kernel_->sent[0].msgid, kernel_->sent[1].msgid);
  EXPECT_NE(kernel_->sent[1].msgid, kernel_->sent[2].msgid);
}

TEST_F(IpmiDeviceTransportTest, AMissingDeviceSaysWhichModuleMakesIt) {
  kernel_->openError = -ENOENT;
  const IpmiResponse response = ask();
  EXPECT_FALSE(response.answered);
  EXPECT_EQ(response.failure,
            "cannot open /dev/ipmi0: No such file or directory (is the ipmi_devintf kernel module "
            "loaded?)");
  EXPECT_TRUE(kernel_->requests.empty());
  EXPECT_TRUE(kernel_->closed.empty());
}

TEST_F(IpmiDeviceTransportTest, ADeviceThatCannotBeOpened) {
  kernel_->openError = -EACCES;
  EXPECT_EQ(ask().failure, "cannot open /dev/ipmi0: Permission denied");
}

TEST_F(IpmiDeviceTransportTest, ASendThatFailsClosesTheDevice) {
  kernel_->sendResults = {-EINVAL};
  const IpmiResponse response = ask();
  EXPECT_FALSE(response.answered);
  EXPECT_EQ(response.failure,
            "cannot send the request to the BMC through /dev/ipmi0: Invalid argument");
  EXPECT_TRUE(kernel_->pollTimeouts.empty());
  expectEverythingClosed();
}

TEST_F(IpmiDeviceTransportTest, AnInterruptedSendIsRepeated) {
  kernel_->sendResults = {-EINTR, 0};
  kernel_->pollSteps = {{}};
  kernel_->incoming = {{0, IPMI_RESPONSE_RECV_TYPE, std::nullopt, 1, 1, {0, 1, 0, 0x40}}};
  ASSERT_TRUE(ask().answered);
  EXPECT_EQ(kernel_->sent.size(), 2u);
}

TEST_F(IpmiDeviceTransportTest, NoAnswerEndsAtTheDeadline) {
  const IpmiResponse response = ask(120ms);
  EXPECT_FALSE(response.answered);
  EXPECT_TRUE(response.timedOut);
  EXPECT_EQ(response.failure, "no answer from the BMC");
  // One wait for the whole time, and the transport gave up exactly at the deadline.
  EXPECT_EQ(kernel_->pollTimeouts, std::vector<int>{120});
  EXPECT_EQ(clock_->elapsed(), 120ms);
  for (const int timeout : kernel_->pollTimeouts) {
    EXPECT_GE(timeout, 0);
    EXPECT_LE(timeout, 120);
  }
  expectEverythingClosed();
}

TEST_F(IpmiDeviceTransportTest, EveryWaitIsForTheTimeLeft) {
  // A signal after 50 ms, an event after 30 ms more; then nothing until the deadline.
  kernel_->pollSteps = {{-EINTR, 0, 50ms}, {1, POLLIN, 30ms}};
  kernel_->incoming = {{0, IPMI_ASYNC_EVENT_RECV_TYPE, std::nullopt, 0x05, 0x02, {0x11}}};
  const IpmiResponse response = ask(120ms);
  EXPECT_TRUE(response.timedOut);
  EXPECT_EQ(kernel_->pollTimeouts, (std::vector<int>{120, 70, 40}));
  EXPECT_EQ(clock_->elapsed(), 120ms);
  expectEverythingClosed();
}

TEST_F(IpmiDeviceTransportTest, APartOfAMillisecondLeftIsWaitedAsAWholeOne) {
  // Rounding down would make poll() return at once, again and again, until the deadline.
  const IpmiResponse response = ask(120ms + 400us);
  EXPECT_TRUE(response.timedOut);
  EXPECT_EQ(kernel_->pollTimeouts, std::vector<int>{121});
  EXPECT_EQ(clock_->elapsed(), 121ms);
}

TEST_F(IpmiDeviceTransportTest, APastDeadlineAsksNothingMore) {
  const IpmiDeviceTransport transport("/dev/ipmi0", kernel_, clock_);
  const IpmiResponse response = transport.transact(kGetChassisStatus, clock_->now() - 1s);
  EXPECT_FALSE(response.answered);
  EXPECT_TRUE(response.timedOut);
  EXPECT_TRUE(kernel_->pollTimeouts.empty());
  expectEverythingClosed();
}

TEST_F(IpmiDeviceTransportTest, SignalsAndSpuriousWakeUpsAreWaitedThrough) {
  kernel_->pollSteps = {{-EINTR, 0}, {}, {}};
  kernel_->incoming = {failedReceive(-EAGAIN),
                       {0, IPMI_RESPONSE_RECV_TYPE, std::nullopt, 1, 1, {0, 1, 0, 0x50}}};
  const IpmiResponse response = ask();
  ASSERT_TRUE(response.answered) << response.failure;
  EXPECT_EQ(response.data, (Bytes{0, 1, 0, 0x50}));
  EXPECT_EQ(kernel_->pollTimeouts.size(), 3u);
}

TEST_F(IpmiDeviceTransportTest, OtherMessagesArePassedOver) {
  kernel_->pollSteps = {{}, {}, {}};
  kernel_->incoming = {
      // An answer to some older request, then an event, then the answer.
      {0, IPMI_RESPONSE_RECV_TYPE, 999999, 1, 1, {0, 1, 0, 0x60}},
      {0, IPMI_ASYNC_EVENT_RECV_TYPE, std::nullopt, 0x05, 0x02, {0x11}},
      {0, IPMI_RESPONSE_RECV_TYPE, std::nullopt, 1, 1, {0, 1, 0, 0x40}},
  };
  const IpmiResponse response = ask();
  ASSERT_TRUE(response.answered) << response.failure;
  EXPECT_EQ(response.data, (Bytes{0, 1, 0, 0x40}));
}

TEST_F(IpmiDeviceTransportTest, ATruncatedAnswerIsStillAnAnswer) {
  kernel_->pollSteps = {{}};
  kernel_->incoming = {{-EMSGSIZE, IPMI_RESPONSE_RECV_TYPE, std::nullopt, 1, 1, {0, 1, 0, 0x60}}};
  const IpmiResponse response = ask();
  ASSERT_TRUE(response.answered) << response.failure;
  EXPECT_EQ(response.data, (Bytes{0, 1, 0, 0x60}));
}

TEST_F(IpmiDeviceTransportTest, AnErrorAnswerIsPassedOnForTheSourceToJudge) {
  kernel_->pollSteps = {{}};
  kernel_->incoming = {{0, IPMI_RESPONSE_RECV_TYPE, std::nullopt, 1, 1, {0xc3}}};
  const IpmiResponse response = ask();
  ASSERT_TRUE(response.answered);
  EXPECT_EQ(response.data, Bytes{0xc3});
}

TEST_F(IpmiDeviceTransportTest, AFailingReceive) {
  kernel_->pollSteps = {{}};
  kernel_->incoming = {failedReceive(-EIO)};
  const IpmiResponse response = ask();
  EXPECT_FALSE(response.answered);
  EXPECT_EQ(response.failure, "cannot receive the answer from /dev/ipmi0: Input/output error");
  expectEverythingClosed();
}

TEST_F(IpmiDeviceTransportTest, AFailingPoll) {
  kernel_->pollSteps = {{-ENOMEM, 0}};
  EXPECT_EQ(ask().failure, "cannot wait for the answer on /dev/ipmi0: Cannot allocate memory");
  kernel_->pollSteps = {{1, POLLERR}};
  EXPECT_EQ(ask().failure, "cannot wait for the answer on /dev/ipmi0: the device reports an error");
  expectEverythingClosed();
}

TEST_F(IpmiDeviceTransportTest, AnAnswerToAnotherCommandIsRefused) {
  kernel_->pollSteps = {{}};
  kernel_->incoming = {{0, IPMI_RESPONSE_RECV_TYPE, std::nullopt, 0x07, 0x01, {0, 1, 2, 3}}};
  EXPECT_EQ(ask().failure, "the BMC answered another command (NetFn 7, command 1)");
}

TEST_F(IpmiDeviceTransportTest, ConcurrentReadersEachGetTheirOwnAnswer) {
  // Each answer carries the message id of the request sent on its descriptor, so a reader that
  // took another reader's answer (or descriptor) would pass it over and run into its deadline.
  kernel_->answerEveryRequest = [](int fd) {
    return Bytes{0, 1, 0, static_cast<std::uint8_t>(fd)};
  };
  const IpmiDeviceTransport transport("/dev/ipmi0", kernel_, clock_);
  std::atomic<int> wrong{0};
  std::vector<std::thread> readers;
  readers.reserve(8);
  for (int t = 0; t < 8; ++t) {
    readers.emplace_back([&] {
      for (int i = 0; i < 50; ++i) {
        const IpmiResponse response = transport.transact(kGetChassisStatus, clock_->now() + 1s);
        if (!response.answered || response.data.size() != 4) {
          ++wrong;
        }
      }
    });
  }
  for (std::thread& reader : readers) {
    reader.join();
  }
  EXPECT_EQ(wrong.load(), 0);
  EXPECT_EQ(kernel_->sent.size(), 400u);
  EXPECT_TRUE(kernel_->openFds.empty());
  EXPECT_EQ(kernel_->closed.size(), 400u);
}

}  // namespace
