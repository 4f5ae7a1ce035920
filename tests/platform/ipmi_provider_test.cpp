// KESTA_BlueLight as a WBEM client sees it when the provider reads a BMC over the network: the
// built provider library, loaded into the in-process host, with KESTA_INSTRUMENTATION naming the
// simulated BMC. Nothing here asserts on wall time: the timed light follows the simulated BMC's
// own clock, which the test moves, and a read that runs into its timeout is told by its log line.
#include <gtest/gtest.h>

#include <cmpihost/cmpihost.h>

#include <algorithm>
#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "IpmiSimulator.h"
#include "TestSupport.h"

namespace {

using namespace std::chrono_literals;
using ipmi_test::IpmiSimulator;
using ipmi_test::SimulatorOptions;
using testsupport::LogCapture;
using testsupport::ScopedEnv;

// The parts of the one light that tell its state.
struct LightSeen {
  std::string deviceId;
  unsigned long long alarmState = 99;
  unsigned long long healthState = 99;
  std::vector<unsigned long long> operationalStatus;
};

class IpmiProviderTest : public ::testing::Test {
 protected:
  void SetUp() override {
    REQUIRE_IPMI_SIMULATOR();
    // The library's logger reads the environment at its first line, so the capture comes first.
    capture_ = std::make_unique<LogCapture>(6000);
    library_ = std::make_unique<cmpihost::ProviderLibrary>(IPMI_TEST_PROVIDER_LIBRARY);
    cmpihost::Request request(broker_);
    load_ = cmpihost::createInstanceMI(*library_, "BlueLightProfileProvider", broker_, request);
    ASSERT_TRUE(load_.ok()) << load_.error;
  }

  void TearDown() override {
    if (load_.mi != nullptr) {
      cmpihost::cleanup(broker_, load_.mi);
    }
  }

  LightSeen enumerate() {
    const cmpihost::Outcome outcome = cmpihost::enumerateInstances(
        broker_, load_.mi, cmpihost::ObjectPathValue("root/cimv2", "KESTA_BlueLight"));
    EXPECT_EQ(outcome.status.rc, CMPI_RC_OK) << outcome.status.message.value_or("");
    const std::vector<cmpihost::InstanceValue> lights = outcome.instances();
    LightSeen seen;
    EXPECT_EQ(lights.size(), 1u);
    if (lights.empty()) {
      return seen;
    }
    const cmpihost::InstanceValue& light = lights.front();
    if (const cmpihost::Value* id = light.find("DeviceID")) {
      seen.deviceId = id->asString();
    }
    if (const cmpihost::Value* state = light.find("AlarmState"); state && !state->isNull()) {
      seen.alarmState = state->asUnsigned();
    }
    if (const cmpihost::Value* health = light.find("HealthState"); health && !health->isNull()) {
      seen.healthState = health->asUnsigned();
    }
    if (const cmpihost::Value* status = light.find("OperationalStatus");
        status && !status->isNull()) {
      for (const cmpihost::Value& element : status->elements()) {
        seen.operationalStatus.push_back(element.asUnsigned());
      }
    }
    return seen;
  }

  std::vector<std::string> instrumentationLines() const {
    return capture_->texts("Kesta.Platform.Instrumentation", "LOG");
  }

  ScopedEnv systemName_{"KESTA_SYSTEM_NAME", std::string("ipmi-test-host")};
  std::unique_ptr<LogCapture> capture_;
  cmpihost::Broker broker_;
  std::unique_ptr<cmpihost::ProviderLibrary> library_;
  cmpihost::InstanceMILoad load_;
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
