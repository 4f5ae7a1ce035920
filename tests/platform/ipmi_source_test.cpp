// The IPMI source over a stand-in transport: the one node it yields for every kind of answer,
// the one log line for every failure, its time bound, and reading it from several threads. Time
// is a ManualClock that moves only when a stand-in waits, so the bound is checked exactly.
#include <gtest/gtest.h>
#include <linux/ipmi.h>
#include <sys/ioctl.h>
#include <sys/stat.h>

#include <atomic>
#include <cerrno>
#include <chrono>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "FakeFileSystem.h"
#include "KestaInstrumentation.h"
#include "ManualClock.h"
#include "PlatformTestSupport.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/ipmi/IpmiSource.h"

namespace {

using namespace std::chrono_literals;
using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::IpmiClock;
using Kesta::platform::IpmiDeviceOs;
using Kesta::platform::IpmiRequest;
using Kesta::platform::IpmiResponse;
using Kesta::platform::IpmiSource;
using Kesta::platform::IpmiSourceOptions;
using Kesta::platform::IpmiSourceSystem;
using Kesta::platform::IpmiTransport;
using Kesta::platform::makeIpmiSource;
using Kesta::platform::OnReport;
using Kesta::platform::SourceError;
using platform_test::FakeFileSystem;
using platform_test::ManualClock;
using testsupport::LogCapture;
using testsupport::ScopedEnv;
using testsupport::TempDir;

using Bytes = std::vector<std::uint8_t>;

const std::string kLogPrefix = "Kesta.Platform.Instrumentation\t6000\tLOG\t";

// What the stand-in transport saw, shared by every transport the factory makes.
struct Exchange {
  std::mutex mutex;
  std::vector<IpmiRequest> requests;
  std::vector<IpmiClock::time_point> deadlines;
  IpmiResponse response;
  bool waitForDeadline = false;  // act as a BMC that never answers
  std::shared_ptr<ManualClock> clock = std::make_shared<ManualClock>();
  std::vector<IpmiClock::time_point> calledAt;  // the clock when transact was called
};

class FakeTransport final : public IpmiTransport {
 public:
  explicit FakeTransport(std::shared_ptr<Exchange> exchange) : exchange_(std::move(exchange)) {}

  IpmiResponse transact(const IpmiRequest& request, IpmiClock::time_point deadline) const override {
    bool wait = false;
    IpmiResponse response;
    {
      std::lock_guard<std::mutex> lock(exchange_->mutex);
      exchange_->requests.push_back(request);
      exchange_->deadlines.push_back(deadline);
      exchange_->calledAt.push_back(exchange_->clock->now());
      wait = exchange_->waitForDeadline;
      response = exchange_->response;
    }
    if (wait) {
      exchange_->clock->advanceTo(deadline);  // waits until the deadline, as a transport does
      return IpmiResponse::timeout("no answer from the BMC");
    }
    return response;
  }

 private:
  std::shared_ptr<Exchange> exchange_;
};

class IpmiSourceTest : public ::testing::Test {
 protected:
  std::unique_ptr<IpmiSource> source(IpmiSourceOptions options = {}) {
    return std::make_unique<IpmiSource>(
        "ipmi:/dev/ipmi0", "ipmi:/dev/ipmi0", std::move(options),
        [exchange = exchange_] { return std::make_unique<FakeTransport>(exchange); },
        exchange_->clock);
  }

  InstrumentationNode readOne(IpmiSourceOptions options = {}) {
    const std::vector<InstrumentationNode> nodes = source(std::move(options))->readNodes();
    EXPECT_EQ(nodes.size(), 1u);
    return nodes.empty() ? InstrumentationNode() : nodes.front();
  }

  void answer(Bytes data) { exchange_->response = IpmiResponse::answer(std::move(data)); }
  void fail(std::string why) { exchange_->response = IpmiResponse::failed(std::move(why)); }

  std::shared_ptr<Exchange> exchange_ = std::make_shared<Exchange>();
};

TEST_F(IpmiSourceTest, AsksGetChassisStatusAndNothingElse) {
  answer({0x00, 0x01, 0x00, 0x40});
  readOne();
  ASSERT_EQ(exchange_->requests.size(), 1u);
  EXPECT_EQ(exchange_->requests[0].netFn, 0x00);
  EXPECT_EQ(exchange_->requests[0].command, 0x01);
  EXPECT_TRUE(exchange_->requests[0].data.empty());
}

TEST_F(IpmiSourceTest, AKnownStateIsAWorkingLightWithItsAlarmState) {
  LogCapture capture;
  answer({0x00, 0x01, 0x00, 0x40});
  InstrumentationNode node = readOne();
  EXPECT_EQ(node.type, 26u);
  EXPECT_EQ(node.path, "ipmi:/dev/ipmi0");
  EXPECT_EQ(node.description, "Blue Light");
  EXPECT_EQ(node.status, 1u);
  EXPECT_EQ(node.property(1), 1u);

  answer({0x00, 0x01, 0x00, 0x50});
  EXPECT_EQ(readOne().property(1), 3u);
  answer({0x00, 0x01, 0x00, 0x60});
  EXPECT_EQ(readOne().property(1), 3u);
  EXPECT_TRUE(platform_test::rawLines(capture).empty());
}

TEST_F(IpmiSourceTest, SteadyLightsReportOnAsSteady) {
  IpmiSourceOptions options;
  options.onReport = OnReport::Steady;
  options.description = "Front ID";
  answer({0x00, 0x01, 0x00, 0x60});
  const InstrumentationNode on = readOne(options);
  EXPECT_EQ(on.property(1), 2u);
  EXPECT_EQ(on.description, "Front ID");
  answer({0x00, 0x01, 0x00, 0x40});
  EXPECT_EQ(readOne(options).property(1), 1u);
}

TEST_F(IpmiSourceTest, AStateTheBmcDoesNotReportIsNoStatusAndNoLogLine) {
  LogCapture capture;
  answer({0x00, 0x01, 0x00, 0x00});
  const InstrumentationNode node = readOne();
  EXPECT_EQ(node.status, 0u);
  EXPECT_TRUE(node.properties.empty());
  EXPECT_TRUE(platform_test::rawLines(capture).empty());
}

TEST_F(IpmiSourceTest, EveryUnusableAnswerIsDegradedWithOneLogLine) {
  const struct {
    Bytes answer;
    std::string reason;
  } cases[] = {
      {{0xc1}, "Get Chassis Status failed with completion code C1h (invalid command)"},
      {{0xd4, 0x01, 0x00, 0x60},
       "Get Chassis Status failed with completion code D4h (insufficient privilege level)"},
      {{0x00, 0x01, 0x00},
       "the answer to Get Chassis Status is too short (3 bytes, at least 4 expected)"},
      {{}, "the answer to Get Chassis Status is empty"},
      {{0x00, 0x01, 0x00, 0x70}, "Get Chassis Status reports the reserved identify state 11b"},
  };
  for (const auto& unusable : cases) {
    LogCapture capture;
    answer(unusable.answer);
    const InstrumentationNode node = readOne();
    EXPECT_EQ(node.status, 21u);
    EXPECT_TRUE(node.properties.empty());
    EXPECT_EQ(platform_test::rawLines(capture),
              std::vector<std::string>{kLogPrefix +
                                       "Instrumentation source \"ipmi:/dev/ipmi0\" cannot read "
                                       "the identify light: " +
                                       unusable.reason});
  }
}

TEST_F(IpmiSourceTest, ATransportFailureIsDegradedWithOneLogLine) {
  LogCapture capture;
  fail("cannot open /dev/ipmi0: Permission denied");
  const InstrumentationNode node = readOne();
  EXPECT_EQ(node.type, 26u);
  EXPECT_EQ(node.path, "ipmi:/dev/ipmi0");
  EXPECT_EQ(node.status, 21u);
  EXPECT_TRUE(node.properties.empty());
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{kLogPrefix +
                                     "Instrumentation source \"ipmi:/dev/ipmi0\" cannot read the "
                                     "identify light: cannot open /dev/ipmi0: Permission denied"});
}

TEST_F(IpmiSourceTest, TheDeadlineIsTheTimeoutFromNow) {
  answer({0x00, 0x01, 0x00, 0x40});
  IpmiSourceOptions options;
  options.timeout = 2500ms;
  const IpmiClock::time_point before = exchange_->clock->now();
  readOne(options);
  const IpmiClock::time_point after = exchange_->clock->now();
  ASSERT_EQ(exchange_->deadlines.size(), 1u);
  EXPECT_GE(exchange_->deadlines[0], before + 2500ms);
  EXPECT_LE(exchange_->deadlines[0], after + 2500ms);
  EXPECT_EQ(exchange_->deadlines[0], ManualClock::kStart + 2500ms);
}

TEST_F(IpmiSourceTest, MakingTheTransportCountsAgainstTheTimeout) {
  // Reading the credentials and loading the network transport take time of the same read.
  answer({0x00, 0x01, 0x00, 0x40});
  IpmiSourceOptions options;
  options.timeout = 300ms;
  const IpmiSource slowToMake(
      "ipmi-lan:bmc?credentials=/c", "ipmi-lan:bmc:623", options,
      [exchange = exchange_] {
        exchange->clock->advance(40ms);
        return std::make_unique<FakeTransport>(exchange);
      },
      exchange_->clock);
  slowToMake.readNodes();
  ASSERT_EQ(exchange_->deadlines.size(), 1u);
  EXPECT_EQ(exchange_->deadlines[0], ManualClock::kStart + 300ms);
  EXPECT_EQ(exchange_->deadlines[0] - exchange_->calledAt[0], 260ms);
}

TEST_F(IpmiSourceTest, ABmcThatNeverAnswersHoldsAReadNoLongerThanTheTimeout) {
  LogCapture capture;
  exchange_->waitForDeadline = true;
  IpmiSourceOptions options;
  options.timeout = 150ms;
  const InstrumentationNode node = readOne(options);
  EXPECT_EQ(node.status, 21u);
  // The source handed the transport the whole timeout, and the read ended at the deadline.
  ASSERT_EQ(exchange_->deadlines.size(), 1u);
  EXPECT_EQ(exchange_->deadlines[0] - exchange_->calledAt[0], 150ms);
  EXPECT_EQ(exchange_->clock->elapsed(), 150ms);
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{kLogPrefix +
                                     "Instrumentation source \"ipmi:/dev/ipmi0\" cannot read the "
                                     "identify light: no answer from the BMC within 150 ms"});
}

TEST_F(IpmiSourceTest, ATransportThatCannotBeMadeMakesTheSourceUnusable) {
  const IpmiSource broken("ipmi-lan:bmc?credentials=/c", "ipmi-lan:bmc:623", {},
                          []() -> std::unique_ptr<IpmiTransport> {
                            throw SourceError("credentials file \"/c\" has mode 0644");
                          });
  EXPECT_THROW(broken.readNodes(), SourceError);
}

TEST_F(IpmiSourceTest, TheCursorShowsTheLight) {
  answer({0x00, 0x01, 0x00, 0x50});
  Instrumentation cursor(source());
  ASSERT_TRUE(cursor.selectNode(NodeLexicon::NODE_TYPE_BLUE_LIGHT));
  EXPECT_EQ(cursor.getPathToNode(), "ipmi:/dev/ipmi0");
  EXPECT_EQ(cursor.getNodeDescription(), "Blue Light");
  EXPECT_EQ(cursor.getNodeStatus(), 1u);
  unsigned int state = 0;
  EXPECT_TRUE(cursor.getProperty(NodeLexicon::PROPERTY_ALARM_STATE, state));
  EXPECT_EQ(state, 3u);
  ++cursor;
  EXPECT_FALSE(static_cast<bool>(cursor));
}

TEST_F(IpmiSourceTest, SeveralThreadsReadAtOnce) {
  answer({0x00, 0x01, 0x00, 0x60});
  const std::unique_ptr<IpmiSource> shared = source();
  std::atomic<int> wrong{0};
  std::vector<std::thread> readers;
  readers.reserve(8);
  for (int t = 0; t < 8; ++t) {
    readers.emplace_back([&] {
      for (int i = 0; i < 200; ++i) {
        const std::vector<InstrumentationNode> nodes = shared->readNodes();
        if (nodes.size() != 1 || nodes[0].status != 1 || nodes[0].property(1) != 3u) {
          ++wrong;
        }
      }
    });
  }
  for (std::thread& reader : readers) {
    reader.join();
  }
  EXPECT_EQ(wrong.load(), 0);
  EXPECT_EQ(exchange_->requests.size(), 1600u);
}

// A device that takes every request and never answers; its poll() waits by moving the clock.
class SilentDevice final : public IpmiDeviceOs {
 public:
  explicit SilentDevice(std::shared_ptr<ManualClock> clock) : clock_(std::move(clock)) {}

  int open(const char*, int) override { return 7; }
  int close(int) override { return 0; }
  int ioctl(int, unsigned long request, void*) override {
    return request == IPMICTL_SEND_COMMAND ? 0 : -EAGAIN;
  }
  int poll(struct pollfd*, nfds_t, int timeoutMilliseconds) override {
    std::lock_guard<std::mutex> lock(mutex_);
    polls.push_back(timeoutMilliseconds);
    clock_->advance(std::chrono::milliseconds(timeoutMilliseconds));
    return 0;
  }

  std::vector<int> polls;

 private:
  std::shared_ptr<ManualClock> clock_;
  std::mutex mutex_;
};

// The factory with every seam: source text, source, in-band transport, the device's system
// calls and the clock.
TEST(IpmiSourceSystemTest, AnInBandReadThatGetsNoAnswerEndsExactlyAtTheTimeout) {
  LogCapture capture;
  IpmiSourceSystem system;
  const auto clock = std::make_shared<ManualClock>();
  const auto device = std::make_shared<SilentDevice>(clock);
  system.clock = clock;
  system.device = device;
  const auto source = makeIpmiSource("ipmi:/dev/ipmi1?timeout=150ms", system);
  const std::vector<InstrumentationNode> nodes = source->readNodes();
  ASSERT_EQ(nodes.size(), 1u);
  EXPECT_EQ(nodes[0].status, 21u);
  EXPECT_EQ(device->polls, std::vector<int>{150});
  EXPECT_EQ(clock->elapsed(), 150ms);
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{kLogPrefix +
                                     "Instrumentation source \"ipmi:/dev/ipmi1?timeout=150ms\" "
                                     "cannot read the identify light: no answer from the BMC "
                                     "within 150 ms"});
}

TEST(IpmiSourceSystemTest, TheCredentialsAreReadThroughTheGivenFileSystem) {
  IpmiSourceSystem system;
  const auto files = std::make_shared<FakeFileSystem>();
  files->addFile("/etc/kesta/bmc.conf", "user = monitor\npassword = n0t-in-the-log\n", 0640);
  system.files = files;
  const auto source = makeIpmiSource("ipmi-lan:bmc?credentials=/etc/kesta/bmc.conf", system);
  try {
    source->readNodes();
    ADD_FAILURE() << "no exception";
  } catch (const SourceError& error) {
    EXPECT_EQ(std::string(error.what()),
              "credentials file \"/etc/kesta/bmc.conf\" has mode 0640, which lets others read or "
              "change it; allow its owner only (chmod 600)");
  }
  EXPECT_EQ(files->count(FakeFileSystem::Call::Open, "/etc/kesta/bmc.conf"), 1u);
  EXPECT_EQ(files->count(FakeFileSystem::Call::Read, "/etc/kesta/bmc.conf"), 0u);
  EXPECT_EQ(files->openDescriptors(), 0u);
}

// The real factory and the real in-band transport, on a device that does not exist.
TEST(IpmiSourceConfigured, AMissingDeviceIsADegradedLightAndOneLogLine) {
  LogCapture capture;
  ScopedEnv source("KESTA_INSTRUMENTATION", "ipmi:/nonexistent/ipmi9?description=Rack%20ID");
  Instrumentation cursor;
  ASSERT_TRUE(cursor.selectNode(NodeLexicon::NODE_TYPE_BLUE_LIGHT));
  EXPECT_EQ(cursor.getPathToNode(), "ipmi:/nonexistent/ipmi9");
  EXPECT_EQ(cursor.getNodeDescription(), "Rack ID");
  EXPECT_EQ(cursor.getNodeStatus(), 21u);
  unsigned int state = 0;
  EXPECT_FALSE(cursor.getProperty(NodeLexicon::PROPERTY_ALARM_STATE, state));
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{
                kLogPrefix +
                "Instrumentation source \"ipmi:/nonexistent/ipmi9?description=Rack%20ID\" cannot "
                "read the identify light: cannot open /nonexistent/ipmi9: No such file or "
                "directory (is the ipmi_devintf kernel module loaded?)"});
}

TEST(IpmiSourceConfigured, ABadSourceTextIsLoggedAndThrownLikeAnyOther) {
  LogCapture capture;
  ScopedEnv source("KESTA_INSTRUMENTATION", "ipmi:?timeout=forever");
  EXPECT_THROW(Instrumentation(), std::exception);
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{
                kLogPrefix +
                "Instrumentation source \"ipmi:?timeout=forever\" (from KESTA_INSTRUMENTATION) "
                "cannot be read: timeout=forever is not a duration such as 1, 0.5, 2.25 (seconds) "
                "or 250ms"});
}

TEST(IpmiSourceConfigured, UnusableCredentialsAreLoggedAndThrown) {
  TempDir dir;
  const std::string file = dir.file("bmc.conf");
  platform_test::writeFileIn(file, "user = monitor\npassword = n0t-in-the-log\n");
  ASSERT_EQ(::chmod(file.c_str(), 0644), 0);
  LogCapture capture;
  const std::string text = "ipmi-lan:127.0.0.1:9?credentials=" + file;
  ScopedEnv source("KESTA_INSTRUMENTATION", text);
  EXPECT_THROW(Instrumentation(), std::exception);
  const std::vector<std::string> lines = platform_test::rawLines(capture);
  EXPECT_EQ(lines,
            std::vector<std::string>{
                kLogPrefix + "Instrumentation source \"" + text +
                "\" (from KESTA_INSTRUMENTATION) cannot be read: credentials file \"" + file +
                "\" has mode 0644, which lets others read or change it; allow its owner "
                "only (chmod 600)"});
  for (const std::string& line : lines) {
    EXPECT_EQ(line.find("n0t-in-the-log"), std::string::npos);
  }
}

TEST(IpmiSourceConfigured, MissingCredentialsAreLoggedAndThrown) {
  LogCapture capture;
  ScopedEnv source("KESTA_INSTRUMENTATION", "ipmi-lan:bmc?credentials=/nonexistent/bmc.conf");
  EXPECT_THROW(Instrumentation(), std::exception);
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{
                kLogPrefix +
                "Instrumentation source \"ipmi-lan:bmc?credentials=/nonexistent/bmc.conf\" (from "
                "KESTA_INSTRUMENTATION) cannot be read: credentials file \"/nonexistent/bmc.conf\" "
                "cannot be opened: No such file or directory"});
}

}  // namespace
