// KESTA_BlueLight as a WBEM client sees it when the provider reads a BMC over the network: the
// built provider library, loaded into the in-process host, with KESTA_INSTRUMENTATION naming the
// simulated BMC. Nothing here asserts on wall time: the timed light follows the simulated BMC's
// own clock, which the test moves, and a read that runs into its timeout is told by its log line.
#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "IpmiSimulator.h"
#include "ProviderLights.h"
#include "TestSupport.h"

namespace {

using namespace std::chrono_literals;
using ipmi_test::IpmiSimulator;
using ipmi_test::SimulatorOptions;
using platform_test::LightSeen;
using platform_test::LoadedProvider;
using testsupport::LogCapture;
using testsupport::ScopedEnv;

class IpmiProviderTest : public ::testing::Test {
 protected:
  void SetUp() override {
    REQUIRE_IPMI_SIMULATOR();
    // The library's logger reads the environment at its first line, so the capture comes first.
    capture_ = std::make_unique<LogCapture>(6000);
    provider_ = std::make_unique<LoadedProvider>(IPMI_TEST_PROVIDER_LIBRARY);
    ASSERT_TRUE(provider_->loaded());
  }

  // The one light of the BMC.
  LightSeen enumerate() {
    const std::vector<LightSeen> lights = provider_->enumerate();
    EXPECT_EQ(lights.size(), 1u);
    return lights.empty() ? LightSeen{} : lights.front();
  }

  std::vector<std::string> instrumentationLines() const {
    return capture_->texts("Kesta.Platform.Instrumentation", "LOG");
  }

  ScopedEnv systemName_{"KESTA_SYSTEM_NAME", std::string("ipmi-test-host")};
  std::unique_ptr<LogCapture> capture_;
  std::unique_ptr<LoadedProvider> provider_;
};

TEST_F(IpmiProviderTest, AlarmStateFollowsChassisIdentify) {
  IpmiSimulator bmc;
  ScopedEnv source("KESTA_INSTRUMENTATION", bmc.sourceText());

  LightSeen light = enumerate();
  EXPECT_EQ(light.deviceId, "Blue Light:ipmi-lan:127.0.0.1:" + std::to_string(bmc.port()));
  EXPECT_EQ(light.alarmState, 1u) << "off";
  EXPECT_EQ(light.healthState, 5u);
  EXPECT_EQ(light.operationalStatus, (std::vector<unsigned long long>{2, 11}));

  bmc.identify({0x00, 0x01});
  light = enumerate();
  EXPECT_EQ(light.alarmState, 3u) << "on until switched off";
  EXPECT_EQ(light.healthState, 5u);

  bmc.identify({0x00});
  EXPECT_EQ(enumerate().alarmState, 1u) << "switched off";

  // On for two seconds of the BMC's clock, which moves only when the test says so.
  bmc.identify({0x02});
  light = enumerate();
  EXPECT_EQ(light.alarmState, 3u) << "on for two seconds";
  EXPECT_EQ(light.healthState, 5u);
  bmc.letTimePass(1s);
  EXPECT_EQ(enumerate().alarmState, 3u) << "one second of two has passed";
  bmc.letTimePass(1s);
  EXPECT_EQ(enumerate().alarmState, 1u) << "the two seconds are over";

  EXPECT_TRUE(instrumentationLines().empty());
}

TEST_F(IpmiProviderTest, ABmcWithoutIdentifyStateShowsNoAlarmStateAndUnknownHealth) {
  IpmiSimulator bmc(SimulatorOptions{false, ""});
  ScopedEnv source("KESTA_INSTRUMENTATION", bmc.sourceText());
  const LightSeen light = enumerate();
  EXPECT_EQ(light.alarmState, 0u);  // the provider's value when the node has no alarm state
  EXPECT_EQ(light.healthState, 0u);
  EXPECT_TRUE(light.operationalStatus.empty());  // node status 0: no status is claimed
  EXPECT_TRUE(instrumentationLines().empty());
}

TEST_F(IpmiProviderTest, AStoppedBmcIsDegradedWithinTheTimeout) {
  IpmiSimulator bmc;
  ScopedEnv source("KESTA_INSTRUMENTATION", bmc.sourceText("timeout=0.5"));
  ASSERT_EQ(enumerate().healthState, 5u);

  bmc.stop();
  const LightSeen light = enumerate();
  EXPECT_EQ(light.healthState, 10u);
  EXPECT_EQ(light.operationalStatus, std::vector<unsigned long long>{3});
  EXPECT_EQ(light.alarmState, 0u);
  const std::vector<std::string> lines = instrumentationLines();
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_NE(lines[0].find("cannot read the identify light: no "), std::string::npos) << lines[0];
  // The read gave up when the configured timeout was over; the platform tests show that it
  // gives up exactly then, by a clock they control.
  const std::string within = " within 500 ms";
  EXPECT_EQ(lines[0].substr(lines[0].size() - std::min(lines[0].size(), within.size())), within)
      << lines[0];
}

}  // namespace
