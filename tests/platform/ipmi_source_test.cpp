// The IPMI source over a stand-in transport: the one node it yields for every kind of answer,
// the one log line for every failure, its time bound, and reading it from several threads.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "KestaInstrumentation.h"
#include "PlatformTestSupport.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/ipmi/IpmiSource.h"

namespace {

using namespace std::chrono_literals;
using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::IpmiClock;
using Kesta::platform::IpmiRequest;
using Kesta::platform::IpmiResponse;
using Kesta::platform::IpmiSource;
using Kesta::platform::IpmiSourceOptions;
using Kesta::platform::IpmiTransport;
using Kesta::platform::OnReport;
using Kesta::platform::SourceError;
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
      wait = exchange_->waitForDeadline;
      response = exchange_->response;
    }
    if (wait) {
      std::this_thread::sleep_until(deadline);
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
        [exchange = exchange_] { return std::make_unique<FakeTransport>(exchange); });
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
  const IpmiClock::time_point before = IpmiClock::now();
  readOne(options);
  const IpmiClock::time_point after = IpmiClock::now();
  ASSERT_EQ(exchange_->deadlines.size(), 1u);
  EXPECT_GE(exchange_->deadlines[0], before + 2500ms);
  EXPECT_LE(exchange_->deadlines[0], after + 2500ms);
}

TEST_F(IpmiSourceTest, ABmcThatNeverAnswersHoldsAReadNoLongerThanTheTimeout) {
  LogCapture capture;
  exchange_->waitForDeadline = true;
  IpmiSourceOptions options;
  options.timeout = 150ms;
  const auto start = std::chrono::steady_clock::now();
  const InstrumentationNode node = readOne(options);
  const auto took = std::chrono::steady_clock::now() - start;
  EXPECT_EQ(node.status, 21u);
  EXPECT_LT(took, 400ms);
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
