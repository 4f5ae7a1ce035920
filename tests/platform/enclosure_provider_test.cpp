// KESTA_BlueLight as a WBEM client sees it when the provider reads the enclosure class: the
// built provider library, loaded into the in-process host, with KESTA_INSTRUMENTATION naming the
// committed enclosure tree (fixtures/enclosure, described in enclosure_source_test.cpp).
#include <gtest/gtest.h>

#include <cmpihost/cmpihost.h>

#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "TestSupport.h"

namespace {

using testsupport::LogCapture;
using testsupport::ScopedEnv;

const std::string kFixture = std::string(PLATFORM_TEST_FIXTURES) + "/enclosure/sys/class/enclosure";
const std::string kSystemName = "enclosure-test-host";

// What a client reads of one light.
struct LightSeen {
  std::string deviceId;
  std::string elementName;
  unsigned long long alarmState = 99;
  unsigned long long healthState = 99;
  std::vector<unsigned long long> operationalStatus;

  friend bool operator==(const LightSeen& a, const LightSeen& b) {
    return a.deviceId == b.deviceId && a.elementName == b.elementName &&
           a.alarmState == b.alarmState && a.healthState == b.healthState &&
           a.operationalStatus == b.operationalStatus;
  }
  friend std::ostream& operator<<(std::ostream& out, const LightSeen& light) {
    out << "{" << light.deviceId << " | " << light.elementName << " | AlarmState "
        << light.alarmState << " | HealthState " << light.healthState << " | OperationalStatus {";
    for (const unsigned long long status : light.operationalStatus) {
      out << " " << status;
    }
    return out << " }}";
  }
};

LightSeen seen(const cmpihost::InstanceValue& instance) {
  LightSeen light;
  if (const cmpihost::Value* id = instance.find("DeviceID")) {
    light.deviceId = id->asString();
  }
  if (const cmpihost::Value* name = instance.find("ElementName")) {
    light.elementName = name->asString();
  }
  if (const cmpihost::Value* state = instance.find("AlarmState"); state && !state->isNull()) {
    light.alarmState = state->asUnsigned();
  }
  if (const cmpihost::Value* health = instance.find("HealthState"); health && !health->isNull()) {
    light.healthState = health->asUnsigned();
  }
  if (const cmpihost::Value* status = instance.find("OperationalStatus");
      status && !status->isNull()) {
    for (const cmpihost::Value& element : status->elements()) {
      light.operationalStatus.push_back(element.asUnsigned());
    }
  }
  return light;
}

// A light that could be read: OperationalStatus {2, 11} (OK, in service), HealthState 5.
LightSeen readable(const std::string& elementName, const std::string& path,
                   unsigned long long alarmState) {
  return {elementName + ":" + path, elementName, alarmState, 5, {2, 11}};
}

class EnclosureProviderTest : public ::testing::Test {
 protected:
  void SetUp() override {
    // The library's logger reads the environment at its first line, so the capture comes first.
    capture_ = std::make_unique<LogCapture>(6000);
    library_ = std::make_unique<cmpihost::ProviderLibrary>(PLATFORM_TEST_PROVIDER_LIBRARY);
    cmpihost::Request request(broker_);
    load_ = cmpihost::createInstanceMI(*library_, "BlueLightProfileProvider", broker_, request);
    ASSERT_TRUE(load_.ok()) << load_.error;
  }

  void TearDown() override {
    if (load_.mi != nullptr) {
      cmpihost::cleanup(broker_, load_.mi);
    }
  }

  std::vector<LightSeen> enumerate() {
    const cmpihost::Outcome outcome = cmpihost::enumerateInstances(
        broker_, load_.mi, cmpihost::ObjectPathValue("root/cimv2", "KESTA_BlueLight"));
    EXPECT_EQ(outcome.status.rc, CMPI_RC_OK) << outcome.status.message.value_or("");
    std::vector<LightSeen> lights;
    for (const cmpihost::InstanceValue& instance : outcome.instances()) {
      lights.push_back(seen(instance));
    }
    return lights;
  }

  std::vector<std::string> instrumentationLines() const {
    return capture_->texts("Kesta.Platform.Instrumentation", "LOG");
  }

  ScopedEnv systemName_{"KESTA_SYSTEM_NAME", kSystemName};
  ScopedEnv source_{"KESTA_INSTRUMENTATION", "enclosure:" + kFixture};
  std::unique_ptr<LogCapture> capture_;
  cmpihost::Broker broker_;
  std::unique_ptr<cmpihost::ProviderLibrary> library_;
  cmpihost::InstanceMILoad load_;
};

const std::string kGarbageLine = "Instrumentation source \"enclosure:" + kFixture +
                                 "\" cannot read the locate light of \"SLOT 10 locate light, "
                                 "enclosure 0x500605b0000272bf\": it holds \"2\", not 0 or 1";

TEST_F(EnclosureProviderTest, EveryLocateLightWithItsNamesAndState) {
  const std::string shelf = " locate light, enclosure 0x500605b0000272bf";
  const std::string idless = " locate light, enclosure 0:0:8:0";
  // In DeviceID order, as the provider hands them over.
  EXPECT_EQ(
      enumerate(),
      (std::vector<LightSeen>{
          readable("ArrayDevice05" + shelf, "enclosure/0x500605b0000272bf/ArrayDevice05", 1),
          readable("SLOT 01" + shelf, "enclosure/0x500605b0000272bf/1", 3),
          readable("SLOT 02" + shelf, "enclosure/0x500605b0000272bf/2", 1),
          // `locate` holds 2: degraded, and no alarm state (the provider shows 0).
          {"SLOT 10" + shelf + ":enclosure/0x500605b0000272bf/10", "SLOT 10" + shelf, 0, 10, {3}},
          readable("Slot 0" + idless, "enclosure/0:0:8:0/0", 1),
          readable("Slot 1" + idless, "enclosure/0:0:8:0/1", 3),
          readable("Slot 10" + idless, "enclosure/0:0:8:0/10", 1),
          readable("Slot 3" + idless, "enclosure/0:0:8:0/3", 1)}));
  EXPECT_EQ(instrumentationLines(), std::vector<std::string>{kGarbageLine});
}

TEST_F(EnclosureProviderTest, ALightIsFoundByItsDeviceId) {
  const std::string elementName = "SLOT 01 locate light, enclosure 0x500605b0000272bf";
  cmpihost::ObjectPathValue path("root/cimv2", "KESTA_BlueLight");
  path.addKey("CreationClassName", cmpihost::Value("KESTA_BlueLight"));
  path.addKey("DeviceID", cmpihost::Value(elementName + ":enclosure/0x500605b0000272bf/1"));
  path.addKey("SystemCreationClassName", cmpihost::Value("KESTA_ComputerSystem"));
  path.addKey("SystemName", cmpihost::Value(kSystemName));
  const cmpihost::Outcome outcome = cmpihost::getInstance(broker_, load_.mi, path);
  ASSERT_EQ(outcome.status.rc, CMPI_RC_OK) << outcome.status.message.value_or("");
  const std::vector<cmpihost::InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 1u);
  EXPECT_EQ(seen(instances[0]), readable(elementName, "enclosure/0x500605b0000272bf/1", 3));
}

}  // namespace
