// The lights of KESTA_BlueLight as a WBEM client reads them from the built provider library,
// loaded into the in-process host: for the tests that check a source end to end.
#ifndef BLUELIGHT_TESTS_PLATFORM_SUPPORT_PROVIDERLIGHTS_H
#define BLUELIGHT_TESTS_PLATFORM_SUPPORT_PROVIDERLIGHTS_H

#include <cmpihost/cmpihost.h>

#include <memory>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

namespace platform_test {

// What a client reads of one light. A number the instance does not carry reads 99.
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
  friend bool operator!=(const LightSeen& a, const LightSeen& b) { return !(a == b); }
};
std::ostream& operator<<(std::ostream& out, const LightSeen& light);

LightSeen lightSeen(const cmpihost::InstanceValue& instance);

// A light that could be read: OperationalStatus {2, 11} (OK, in service), HealthState 5, and the
// DeviceID "<elementName>:<path>".
LightSeen readableLight(const std::string& elementName, const std::string& path,
                        unsigned long long alarmState);

// The provider library loaded with the instance provider of the lights. The environment the
// library reads at its first log line (the log sink, KESTA_INSTRUMENTATION) must be set before.
class LoadedProvider {
 public:
  // Fails the test (and has no provider) when the library does not load.
  explicit LoadedProvider(const std::string& library);
  ~LoadedProvider();
  LoadedProvider(const LoadedProvider&) = delete;
  LoadedProvider& operator=(const LoadedProvider&) = delete;

  bool loaded() const { return load_.mi != nullptr; }
  // EnumerateInstances of KESTA_BlueLight in root/cimv2; a status other than OK fails the test.
  std::vector<LightSeen> enumerate();
  // GetInstance of the light of `deviceId` on `systemName`; nullopt when the provider does not
  // answer with it.
  std::optional<LightSeen> get(const std::string& systemName, const std::string& deviceId);

 private:
  cmpihost::Broker broker_;
  std::unique_ptr<cmpihost::ProviderLibrary> library_;
  cmpihost::InstanceMILoad load_;
};

}  // namespace platform_test

#endif  // BLUELIGHT_TESTS_PLATFORM_SUPPORT_PROVIDERLIGHTS_H
