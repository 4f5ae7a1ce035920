// KESTA_BlueLight as a WBEM client sees it when the provider reads a Redfish service: the built
// provider library, loaded into the in-process host, with KESTA_INSTRUMENTATION naming the mock
// service of tests/redfish-mock on a loopback port. The library finds the transport plug-in beside
// itself in the build tree, as an installed one finds it beside itself.
#include <gtest/gtest.h>

#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "ProviderLights.h"
#include "RedfishMock.h"
#include "TestSupport.h"

namespace {

using platform_test::LightSeen;
using platform_test::LoadedProvider;
using redfish_test::RedfishMock;
using testsupport::LogCapture;
using testsupport::ScopedEnv;

class RedfishProviderTest : public ::testing::Test {
 protected:
  void SetUp() override {
    // The library's logger reads the environment at its first line, so the capture comes first.
    capture_ = std::make_unique<LogCapture>(6000);
    provider_ = std::make_unique<LoadedProvider>(REDFISH_TEST_PROVIDER_LIBRARY);
    ASSERT_TRUE(provider_->loaded());
  }

  // Every light by its DeviceID.
  std::map<std::string, LightSeen> enumerate() {
    std::map<std::string, LightSeen> lights;
    for (LightSeen& light : provider_->enumerate()) {
      lights[light.deviceId] = std::move(light);
    }
    return lights;
  }

  std::vector<std::string> instrumentationLines() const {
    return capture_->texts("Kesta.Platform.Instrumentation", "LOG");
  }

  ScopedEnv systemName_{"KESTA_SYSTEM_NAME", std::string("redfish-test-host")};
  std::unique_ptr<LogCapture> capture_;
  std::unique_ptr<LoadedProvider> provider_;
};

TEST_F(RedfishProviderTest, EveryChassisAndDriveLightIsAnInstance) {
  RedfishMock mock;
  ScopedEnv source("KESTA_INSTRUMENTATION", mock.sourceText());
  const std::map<std::string, LightSeen> lights = enumerate();
  ASSERT_EQ(lights.size(), 9u);

  const std::string path = "redfish:127.0.0.1:" + std::to_string(mock.port());
  const std::string drives = path + "/redfish/v1/Chassis/1U/Drives/";
  const auto light = [&lights](const std::string& id) {
    const auto found = lights.find(id);
    EXPECT_NE(found, lights.end()) << id;
    return found == lights.end() ? LightSeen() : found->second;
  };
  const LightSeen chassis = light("Rack Server:" + path + "/redfish/v1/Chassis/1U");
  EXPECT_EQ(chassis.alarmState, 1u) << "off";
  EXPECT_EQ(chassis.healthState, 5u);
  EXPECT_EQ(chassis.operationalStatus, (std::vector<unsigned long long>{2, 11}));

  const LightSeen on = light("Drive Bay 1 in Rack Server:" + drives + "1");
  EXPECT_EQ(on.alarmState, 3u) << "LocationIndicatorActive true blinks";
  EXPECT_EQ(on.healthState, 5u);

  const LightSeen warning = light("Drive Bay 2 in Rack Server:" + drives + "2");
  EXPECT_EQ(warning.alarmState, 1u);
  EXPECT_EQ(warning.healthState, 10u) << "Status.Health Warning";
  EXPECT_EQ(warning.operationalStatus, (std::vector<unsigned long long>{3, 5}));

  const LightSeen critical = light("Drive Bay 4 in Rack Server:" + drives + "4");
  EXPECT_EQ(critical.alarmState, 3u);
  EXPECT_EQ(critical.healthState, 10u) << "Status.Health Critical";
  EXPECT_EQ(critical.operationalStatus, std::vector<unsigned long long>{3});

  // A drive without a Name is described by its path.
  light("/redfish/v1/Chassis/1U/Drives/7 in Rack Server:" + drives + "7");
  EXPECT_TRUE(instrumentationLines().empty());
  EXPECT_EQ(mock.connections(), 1u);
}

TEST_F(RedfishProviderTest, OnSteadyAndIndicatorLed) {
  RedfishMock mock({"indicator-led-only", "", {}});
  ScopedEnv source("KESTA_INSTRUMENTATION", mock.sourceText("on=steady"));
  const std::map<std::string, LightSeen> lights = enumerate();
  const std::string path = "redfish:127.0.0.1:" + std::to_string(mock.port());
  ASSERT_EQ(lights.size(), 3u);
  EXPECT_EQ(lights.at("Front Panel:" + path + "/redfish/v1/Chassis/Front").alarmState, 2u) << "Lit";
  EXPECT_EQ(lights.at("Rear Panel:" + path + "/redfish/v1/Chassis/Rear").alarmState, 2u)
      << "Blinking, reported steady as on=steady says";
  EXPECT_EQ(lights.at("Tray Panel:" + path + "/redfish/v1/Chassis/Tray").alarmState, 1u) << "Off";
}

TEST_F(RedfishProviderTest, AWrongValueIsADegradedLightAndOneLogLine) {
  RedfishMock mock({"wrong-types", "", {}});
  const std::string text = mock.sourceText();
  ScopedEnv source("KESTA_INSTRUMENTATION", text);
  const std::map<std::string, LightSeen> lights = enumerate();
  const std::string path = "redfish:127.0.0.1:" + std::to_string(mock.port());
  ASSERT_EQ(lights.size(), 6u);
  const LightSeen purple = lights.at("Purple Light:" + path + "/redfish/v1/Chassis/Purple");
  EXPECT_EQ(purple.alarmState, 0u) << "no alarm state is claimed";
  EXPECT_EQ(purple.healthState, 10u);
  EXPECT_EQ(purple.operationalStatus, std::vector<unsigned long long>{3});
  const std::vector<std::string> lines = instrumentationLines();
  ASSERT_EQ(lines.size(), 5u);
  EXPECT_EQ(lines[0], "Instrumentation source \"" + text +
                          "\" cannot read the identify light of /redfish/v1/Chassis/Purple: "
                          "IndicatorLED is the string \"Purple\", not \"Lit\", \"Blinking\", "
                          "\"Off\" or null");
}

TEST_F(RedfishProviderTest, AServiceThatRefusesTheAccountGivesNoLightsAndOneLogLine) {
  RedfishMock mock;
  std::string text = mock.sourceText();
  text.replace(text.find(mock.credentials()), mock.credentials().size(), mock.wrongCredentials());
  ScopedEnv source("KESTA_INSTRUMENTATION", text);
  // The module answers with the lights it could list, none here, and success (enumerate() checks
  // the status); the reason is in the log.
  EXPECT_TRUE(provider_->enumerate().empty());
  const std::vector<std::string> lines = instrumentationLines();
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_EQ(lines[0],
            "Instrumentation source \"" + text +
                "\" (from KESTA_INSTRUMENTATION) cannot be read: GET /redfish/v1/Chassis: "
                "HTTP status 401 (Unauthorized): the service does not accept the account "
                "of the credentials file");
  EXPECT_EQ(lines[0].find("not-the-password"), std::string::npos);
}

}  // namespace
