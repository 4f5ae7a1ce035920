// The "ipmi-lan:" source against a real RMCP+ peer: OpenIPMI's BMC simulator on a loopback port,
// read through the platform cursor exactly as an operation of the provider reads it.
//
// Nothing here asserts on wall time. The light's timed state follows the simulated BMC's own
// clock, which the tests move; a read that runs into its timeout is checked by what the source
// handed its transport, measured by a ManualClock that no wait moves (the plug-in waits on its
// own), and by the status and the log line it gives.
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <iostream>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "IpmiSimulator.h"
#include "KestaInstrumentation.h"
#include "ManualClock.h"
#include "PlatformTestSupport.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/ipmi/IpmiCredentials.h"
#include "instrumentation/ipmi/IpmiLanTransport.h"
#include "instrumentation/ipmi/IpmiSource.h"

namespace {

using namespace std::chrono_literals;
using ipmi_test::IpmiSimulator;
using ipmi_test::SimulatorOptions;
using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::InstrumentationSource;
using Kesta::platform::IpmiClock;
using Kesta::platform::IpmiRequest;
using Kesta::platform::IpmiResponse;
using Kesta::platform::IpmiTransport;
using Kesta::platform::makeInstrumentationSource;
using platform_test::ManualClock;
using testsupport::LogCapture;
using testsupport::ScopedEnv;
using Clock = std::chrono::steady_clock;

const std::string kLogPrefix = "Kesta.Platform.Instrumentation\t6000\tLOG\t";

// What one operation sees of the light.
struct Light {
  std::string path;
  std::string description;
  unsigned int status = 0;
  std::optional<unsigned int> alarmState;
};

Light lightOf(Instrumentation& cursor) {
  Light light;
  if (!cursor.selectNode(NodeLexicon::NODE_TYPE_BLUE_LIGHT)) {
    ADD_FAILURE() << "no blue light";
    return light;
  }
  light.path = cursor.getPathToNode();
  light.description = cursor.getNodeDescription();
  light.status = cursor.getNodeStatus();
  unsigned int state = 0;
  if (cursor.getProperty(NodeLexicon::PROPERTY_ALARM_STATE, state)) {
    light.alarmState = state;
  }
  ++cursor;
  EXPECT_FALSE(static_cast<bool>(cursor)) << "more than one node";
  return light;
}

// Through the configured source (KESTA_INSTRUMENTATION), as an operation reads it.
Light readLight() {
  Instrumentation cursor;
  return lightOf(cursor);
}

// Through a given source.
Light readLight(std::unique_ptr<InstrumentationSource> source) {
  Instrumentation cursor(std::move(source));
  return lightOf(cursor);
}

// The time until the deadline that sources handed their transports, by their clock.
struct Handed {
  std::mutex mutex;
  std::vector<IpmiClock::duration> timeouts;
};

class RecordingTransport final : public IpmiTransport {
 public:
  RecordingTransport(std::unique_ptr<IpmiTransport> transport, std::shared_ptr<ManualClock> clock,
                     std::shared_ptr<Handed> handed)
      : transport_(std::move(transport)), clock_(std::move(clock)), handed_(std::move(handed)) {}

  IpmiResponse transact(const IpmiRequest& request, IpmiClock::time_point deadline) const override {
    {
      std::lock_guard<std::mutex> lock(handed_->mutex);
      handed_->timeouts.push_back(deadline - clock_->now());
    }
    return transport_->transact(request, deadline);
  }

 private:
  std::unique_ptr<IpmiTransport> transport_;
  std::shared_ptr<ManualClock> clock_;
  std::shared_ptr<Handed> handed_;
};

// The source makeIpmiSource makes of `text` ("ipmi-lan:..."), on a ManualClock, with each of its
// transports recording what it was handed.
std::unique_ptr<InstrumentationSource> recordedSource(const std::string& text,
                                                      const std::shared_ptr<Handed>& handed) {
  using namespace Kesta::platform;
  const std::string_view scheme = "ipmi-lan:";
  const IpmiLanSourceSettings settings =
      parseIpmiLanSource(std::string_view(text).substr(scheme.size()));
  const auto clock = std::make_shared<ManualClock>();
  IpmiSourceSystem system;
  system.clock = clock;
  return std::make_unique<IpmiSource>(
      text, ipmiLanPath(settings), settings.options,
      [transport = ipmiLanTransportFactory(settings, system), clock, handed] {
        return std::make_unique<RecordingTransport>(transport(), clock, handed);
      },
      clock);
}

class IpmiSimulatorTest : public ::testing::Test {
 protected:
  void SetUp() override { REQUIRE_IPMI_SIMULATOR(); }
};

TEST_F(IpmiSimulatorTest, TheAlarmStateFollowsChassisIdentify) {
  IpmiSimulator bmc;
  ScopedEnv source("KESTA_INSTRUMENTATION", bmc.sourceText());
  LogCapture capture;

  Light light = readLight();
  EXPECT_EQ(light.path, "ipmi-lan:127.0.0.1:" + std::to_string(bmc.port()));
  EXPECT_EQ(light.description, "Blue Light");
  EXPECT_EQ(light.status, 1u);
  EXPECT_EQ(light.alarmState, 1u) << "off";

  bmc.identify({0x00, 0x01});
  light = readLight();
  EXPECT_EQ(light.status, 1u);
  EXPECT_EQ(light.alarmState, 3u) << "on until switched off";

  bmc.identify({0x00});
  EXPECT_EQ(readLight().alarmState, 1u) << "switched off";

  // On for two seconds of the BMC's clock: on while they last, off by itself afterwards.
  bmc.identify({0x02});
  light = readLight();
  EXPECT_EQ(light.status, 1u);
  EXPECT_EQ(light.alarmState, 3u) << "on for an interval";
  bmc.letTimePass(1s);
  EXPECT_EQ(readLight().alarmState, 3u) << "one second of two has passed";
  bmc.letTimePass(1s);
  EXPECT_EQ(readLight().alarmState, 1u) << "the interval is over";

  EXPECT_TRUE(platform_test::rawLines(capture).empty());
}

TEST_F(IpmiSimulatorTest, SteadyLightsAndOwnDescriptions) {
  IpmiSimulator bmc;
  ScopedEnv source("KESTA_INSTRUMENTATION",
                   bmc.sourceText("on=steady&description=Rack%207%20ID&timeout=2"));
  bmc.identify({0x00, 0x01});
  const Light light = readLight();
  EXPECT_EQ(light.description, "Rack 7 ID");
  EXPECT_EQ(light.alarmState, 2u);
  bmc.identify({0x05});
  EXPECT_EQ(readLight().alarmState, 2u);
  bmc.identify({0x00});
  EXPECT_EQ(readLight().alarmState, 1u);
}

TEST_F(IpmiSimulatorTest, WithoutTheIdentifyPlugInTheStateIsNotReported) {
  IpmiSimulator bmc(SimulatorOptions{false, ""});
  ScopedEnv source("KESTA_INSTRUMENTATION", bmc.sourceText());
  LogCapture capture;
  const Light light = readLight();
  EXPECT_EQ(light.status, 0u);
  EXPECT_FALSE(light.alarmState.has_value());
  EXPECT_TRUE(platform_test::rawLines(capture).empty());
}

TEST_F(IpmiSimulatorTest, AStoppedBmcIsDegradedWithinTheTimeout) {
  IpmiSimulator bmc;
  const std::string text = bmc.sourceText("timeout=0.5");
  const auto handed = std::make_shared<Handed>();
  ASSERT_EQ(readLight(recordedSource(text, handed)).status, 1u);  // a session is open now

  bmc.stop();
  LogCapture capture;
  const Light light = readLight(recordedSource(text, handed));
  EXPECT_EQ(light.status, 21u);
  EXPECT_FALSE(light.alarmState.has_value());
  // Each read handed its transport the whole timeout, and no more.
  EXPECT_EQ(handed->timeouts, (std::vector<IpmiClock::duration>{500ms, 500ms}));
  const std::vector<std::string> lines = platform_test::rawLines(capture);
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_EQ(lines[0].rfind(kLogPrefix + "Instrumentation source \"" + text +
                               "\" cannot read the identify light: no ",
                           0),
            0u)
      << lines[0];
  const std::string within = " within 500 ms";
  EXPECT_EQ(lines[0].substr(lines[0].size() - std::min(lines[0].size(), within.size())), within)
      << lines[0];
  EXPECT_EQ(lines[0].find("reader-pass"), std::string::npos);
}

TEST_F(IpmiSimulatorTest, ABmcThatNeverAnsweredIsDegradedWithinTheTimeout) {
  const unsigned int port = ipmi_test::freeUdpPort();  // nothing listens there
  testsupport::TempDir dir;
  ipmi_test::writePrivateFile(dir.file("bmc.conf"), "user = reader\npassword = reader-pass\n");
  const std::string text = "ipmi-lan:127.0.0.1:" + std::to_string(port) +
                           "?timeout=300ms&credentials=" + dir.file("bmc.conf");
  const auto handed = std::make_shared<Handed>();
  LogCapture capture;
  const Light light = readLight(recordedSource(text, handed));
  EXPECT_EQ(handed->timeouts, std::vector<IpmiClock::duration>{300ms});
  EXPECT_EQ(light.status, 21u);
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{kLogPrefix + "Instrumentation source \"" + text +
                                     "\" cannot read the identify light: no session with the BMC "
                                     "(it does not answer, or does not accept the login) within "
                                     "300 ms"});
}

TEST_F(IpmiSimulatorTest, TheNetworkTransportMeasuresTheDeadlineByItsOwnClock) {
  IpmiSimulator bmc;
  Kesta::platform::IpmiLanTarget target;
  target.host = "127.0.0.1";
  target.port = bmc.port();
  target.credentials = Kesta::platform::readIpmiCredentials(bmc.readerCredentials());
  const auto clock = std::make_shared<ManualClock>();
  const Kesta::platform::IpmiLanTransport transport(std::move(target), clock);
  const IpmiRequest getChassisStatus{0x00, 0x01, {}};
  // The deadline has come by the transport's clock. A transport that read the steady clock
  // instead would see hours left (unless the machine has been up for 1000 hours).
  const IpmiResponse late = transport.transact(getChassisStatus, clock->now());
  EXPECT_FALSE(late.answered);
  EXPECT_TRUE(late.timedOut);
  EXPECT_EQ(late.failure, "no time was left to ask the BMC");
  const IpmiResponse inTime = transport.transact(getChassisStatus, clock->now() + 1s);
  EXPECT_TRUE(inTime.answered) << inTime.failure;
}

TEST_F(IpmiSimulatorTest, AWrongPasswordIsDegradedAndNeverLogged) {
  IpmiSimulator bmc;
  testsupport::TempDir dir;
  ipmi_test::writePrivateFile(dir.file("bmc.conf"), "user = reader\npassword = wr0ng-pa55word\n");
  const std::string text =
      "ipmi-lan:127.0.0.1:" + std::to_string(bmc.port()) + "?credentials=" + dir.file("bmc.conf");
  const auto handed = std::make_shared<Handed>();
  LogCapture capture;
  const Light light = readLight(recordedSource(text, handed));
  EXPECT_EQ(handed->timeouts, std::vector<IpmiClock::duration>{1000ms}) << "the default timeout";
  EXPECT_EQ(light.status, 21u);
  const std::vector<std::string> lines = platform_test::rawLines(capture);
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_NE(lines[0].find("cannot read the identify light: "), std::string::npos) << lines[0];
  EXPECT_EQ(lines[0].find("wr0ng"), std::string::npos) << lines[0];
  EXPECT_EQ(lines[0].find("reader-pass"), std::string::npos) << lines[0];
}

TEST_F(IpmiSimulatorTest, AShortAnswerIsDegraded) {
  IpmiSimulator bmc(SimulatorOptions{true, "reply=short"});
  ScopedEnv source("KESTA_INSTRUMENTATION", bmc.sourceText());
  LogCapture capture;
  const Light light = readLight();
  EXPECT_EQ(light.status, 21u);
  EXPECT_FALSE(light.alarmState.has_value());
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{kLogPrefix + "Instrumentation source \"" + bmc.sourceText() +
                                     "\" cannot read the identify light: the answer to Get "
                                     "Chassis Status is too short (3 bytes, at least 4 "
                                     "expected)"});
}

TEST_F(IpmiSimulatorTest, AnErrorCompletionCodeIsDegraded) {
  IpmiSimulator bmc(SimulatorOptions{true, "reply=cc:c0"});
  ScopedEnv source("KESTA_INSTRUMENTATION", bmc.sourceText());
  LogCapture capture;
  const Light light = readLight();
  EXPECT_EQ(light.status, 21u);
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{kLogPrefix + "Instrumentation source \"" + bmc.sourceText() +
                                     "\" cannot read the identify light: Get Chassis Status "
                                     "failed with completion code C0h (node busy)"});
}

TEST_F(IpmiSimulatorTest, SeveralOperationsReadAtOnce) {
  IpmiSimulator bmc;
  bmc.identify({0x00, 0x01});
  const std::string text = bmc.sourceText();
  std::atomic<int> wrong{0};
  std::vector<std::thread> readers;
  readers.reserve(8);
  for (int t = 0; t < 8; ++t) {
    readers.emplace_back([&] {
      for (int i = 0; i < 50; ++i) {
        const std::vector<InstrumentationNode> nodes = makeInstrumentationSource(text)->readNodes();
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
}

// One read as an operation makes it: the source text, the credentials file, the cursor, one
// Get Chassis Status over the open session. The median of 1,000 is reported, not judged: how
// long a read takes depends on the machine and on what else it does at the moment.
TEST_F(IpmiSimulatorTest, MedianTimeOfOneRead) {
  IpmiSimulator bmc;
  ScopedEnv source("KESTA_INSTRUMENTATION", bmc.sourceText());
  ASSERT_EQ(readLight().status, 1u);  // opens the session
  std::vector<std::chrono::nanoseconds> samples;
  samples.reserve(1000);
  for (int i = 0; i < 1000; ++i) {
    const Clock::time_point start = Clock::now();
    Instrumentation cursor;
    cursor.selectNode(NodeLexicon::NODE_TYPE_BLUE_LIGHT);
    const unsigned int status = cursor.getNodeStatus();
    samples.push_back(Clock::now() - start);
    ASSERT_EQ(status, 1u);
  }
  const double median = ipmi_test::medianMicroseconds(samples);
  std::cout << "median time of one read over loopback (1000 reads): " << median << " us\n";
  RecordProperty("median_read_microseconds", std::to_string(median));
}

}  // namespace
