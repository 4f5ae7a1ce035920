// The "ipmi-lan:" source against a real RMCP+ peer: OpenIPMI's BMC simulator on a loopback port,
// read through the platform cursor exactly as an operation of the provider reads it.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <iostream>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "IpmiSimulator.h"
#include "KestaInstrumentation.h"
#include "PlatformTestSupport.h"
#include "instrumentation/InstrumentationSource.h"

namespace {

using namespace std::chrono_literals;
using ipmi_test::IpmiSimulator;
using ipmi_test::SimulatorOptions;
using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::makeInstrumentationSource;
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

Light readLight() {
  Instrumentation cursor;
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

  // On for one second: on while it lasts, off by itself afterwards.
  const Clock::time_point switched = Clock::now();
  bmc.identify({0x01});
  light = readLight();
  ASSERT_LT(Clock::now() - switched, 900ms) << "too slow to see the timed state";
  EXPECT_EQ(light.alarmState, 3u) << "on for an interval";
  std::this_thread::sleep_until(switched + 1300ms);
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
  ScopedEnv source("KESTA_INSTRUMENTATION", bmc.sourceText("timeout=0.5"));
  ASSERT_EQ(readLight().status, 1u);  // a session is open now

  bmc.stop();
  LogCapture capture;
  const Clock::time_point start = Clock::now();
  const Light light = readLight();
  const auto took = Clock::now() - start;
  EXPECT_EQ(light.status, 21u);
  EXPECT_FALSE(light.alarmState.has_value());
  EXPECT_LT(took, 700ms);
  const std::vector<std::string> lines = platform_test::rawLines(capture);
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_EQ(
      lines[0].rfind(kLogPrefix + "Instrumentation source \"" + bmc.sourceText("timeout=0.5") +
                         "\" cannot read the identify light: no ",
                     0),
      0u)
      << lines[0];
  EXPECT_EQ(lines[0].find("reader-pass"), std::string::npos);
}

TEST_F(IpmiSimulatorTest, ABmcThatNeverAnsweredIsDegradedWithinTheTimeout) {
  const unsigned int port = ipmi_test::freeUdpPort();  // nothing listens there
  testsupport::TempDir dir;
  ipmi_test::writePrivateFile(dir.file("bmc.conf"), "user = reader\npassword = reader-pass\n");
  const std::string text = "ipmi-lan:127.0.0.1:" + std::to_string(port) +
                           "?timeout=300ms&credentials=" + dir.file("bmc.conf");
  ScopedEnv source("KESTA_INSTRUMENTATION", text);
  LogCapture capture;
  const Clock::time_point start = Clock::now();
  const Light light = readLight();
  EXPECT_LT(Clock::now() - start, 500ms);
  EXPECT_EQ(light.status, 21u);
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{kLogPrefix + "Instrumentation source \"" + text +
                                     "\" cannot read the identify light: no session with the BMC "
                                     "(it does not answer, or does not accept the login) within "
                                     "300 ms"});
}

TEST_F(IpmiSimulatorTest, AWrongPasswordIsDegradedAndNeverLogged) {
  IpmiSimulator bmc;
  testsupport::TempDir dir;
  ipmi_test::writePrivateFile(dir.file("bmc.conf"), "user = reader\npassword = wr0ng-pa55word\n");
  const std::string text =
      "ipmi-lan:127.0.0.1:" + std::to_string(bmc.port()) + "?credentials=" + dir.file("bmc.conf");
  ScopedEnv source("KESTA_INSTRUMENTATION", text);
  LogCapture capture;
  const Clock::time_point start = Clock::now();
  const Light light = readLight();
  EXPECT_LT(Clock::now() - start, 1200ms);
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
// Get Chassis Status over the open session. The median of 1,000 is reported.
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
  EXPECT_LT(median, 100000.0);
}

}  // namespace
