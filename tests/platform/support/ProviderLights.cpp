#include "ProviderLights.h"

#include <gtest/gtest.h>

namespace platform_test {

std::ostream& operator<<(std::ostream& out, const LightSeen& light) {
  out << "{" << light.deviceId << " | " << light.elementName << " | AlarmState " << light.alarmState
      << " | HealthState " << light.healthState << " | OperationalStatus {";
  for (const unsigned long long status : light.operationalStatus) {
    out << " " << status;
  }
  return out << " }}";
}

LightSeen lightSeen(const cmpihost::InstanceValue& instance) {
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

LightSeen readableLight(const std::string& elementName, const std::string& path,
                        unsigned long long alarmState) {
  return {elementName + ":" + path, elementName, alarmState, 5, {2, 11}};
}

LoadedProvider::LoadedProvider(const std::string& library)
    : library_(std::make_unique<cmpihost::ProviderLibrary>(library)) {
  cmpihost::Request request(broker_);
  load_ = cmpihost::createInstanceMI(*library_, "BlueLightProfileProvider", broker_, request);
  EXPECT_TRUE(load_.ok()) << load_.error;
}

LoadedProvider::~LoadedProvider() {
  if (load_.mi != nullptr) {
    cmpihost::cleanup(broker_, load_.mi);
  }
}

std::vector<LightSeen> LoadedProvider::enumerate() {
  std::vector<LightSeen> lights;
  if (!loaded()) {
    ADD_FAILURE() << "no provider to ask";
    return lights;
  }
  const cmpihost::Outcome outcome = cmpihost::enumerateInstances(
      broker_, load_.mi, cmpihost::ObjectPathValue("root/cimv2", "KESTA_BlueLight"));
  EXPECT_EQ(outcome.status.rc, CMPI_RC_OK) << outcome.status.message.value_or("");
  for (const cmpihost::InstanceValue& instance : outcome.instances()) {
    lights.push_back(lightSeen(instance));
  }
  return lights;
}

std::optional<LightSeen> LoadedProvider::get(const std::string& systemName,
                                             const std::string& deviceId) {
  if (!loaded()) {
    ADD_FAILURE() << "no provider to ask";
    return std::nullopt;
  }
  cmpihost::ObjectPathValue path("root/cimv2", "KESTA_BlueLight");
  path.addKey("CreationClassName", cmpihost::Value("KESTA_BlueLight"));
  path.addKey("DeviceID", cmpihost::Value(deviceId));
  path.addKey("SystemCreationClassName", cmpihost::Value("KESTA_ComputerSystem"));
  path.addKey("SystemName", cmpihost::Value(systemName));
  const cmpihost::Outcome outcome = cmpihost::getInstance(broker_, load_.mi, path);
  const std::vector<cmpihost::InstanceValue> instances = outcome.instances();
  if (outcome.status.rc != CMPI_RC_OK || instances.size() != 1) {
    return std::nullopt;
  }
  return lightSeen(instances.front());
}

}  // namespace platform_test
