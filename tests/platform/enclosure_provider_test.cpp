// KESTA_BlueLight as a WBEM client sees it when the provider reads the enclosure class: the
// built provider library, loaded into the in-process host, with KESTA_INSTRUMENTATION naming the
// committed enclosure tree (fixtures/enclosure, described in enclosure_source_test.cpp).
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "ProviderLights.h"
#include "TestSupport.h"

namespace {

using platform_test::LightSeen;
using platform_test::LoadedProvider;
using platform_test::readableLight;
using testsupport::LogCapture;
using testsupport::ScopedEnv;

const std::string kFixture = std::string(PLATFORM_TEST_FIXTURES) + "/enclosure/sys/class/enclosure";
const std::string kSystemName = "enclosure-test-host";

class EnclosureProviderTest : public ::testing::Test {
 protected:
  void SetUp() override {
    // The library's logger reads the environment at its first line, so the capture comes first.
    capture_ = std::make_unique<LogCapture>(6000);
    provider_ = std::make_unique<LoadedProvider>(PLATFORM_TEST_PROVIDER_LIBRARY);
    ASSERT_TRUE(provider_->loaded());
  }

  std::vector<std::string> instrumentationLines() const {
    return capture_->texts("Kesta.Platform.Instrumentation", "LOG");
  }

  ScopedEnv systemName_{"KESTA_SYSTEM_NAME", kSystemName};
  ScopedEnv source_{"KESTA_INSTRUMENTATION", "enclosure:" + kFixture};
  std::unique_ptr<LogCapture> capture_;
  std::unique_ptr<LoadedProvider> provider_;
};

const std::string kGarbageLine = "Instrumentation source \"enclosure:" + kFixture +
                                 "\" cannot read the locate light of \"SLOT 10 locate light, "
                                 "enclosure 0x500605b0000272bf\": it holds \"2\", not 0 or 1";

TEST_F(EnclosureProviderTest, EveryLocateLightWithItsNamesAndState) {
  const std::string shelf = " locate light, enclosure 0x500605b0000272bf";
  const std::string idless = " locate light, enclosure 0:0:8:0";
  // In DeviceID order, as the provider hands them over.
  EXPECT_EQ(
      provider_->enumerate(),
      (std::vector<LightSeen>{
          readableLight("ArrayDevice05" + shelf, "enclosure/0x500605b0000272bf/ArrayDevice05", 1),
          readableLight("SLOT 01" + shelf, "enclosure/0x500605b0000272bf/1", 3),
          readableLight("SLOT 02" + shelf, "enclosure/0x500605b0000272bf/2", 1),
          // `locate` holds 2: degraded, and no alarm state (the provider shows 0).
          {"SLOT 10" + shelf + ":enclosure/0x500605b0000272bf/10", "SLOT 10" + shelf, 0, 10, {3}},
          readableLight("Slot 0" + idless, "enclosure/0:0:8:0/0", 1),
          readableLight("Slot 1" + idless, "enclosure/0:0:8:0/1", 3),
          readableLight("Slot 10" + idless, "enclosure/0:0:8:0/10", 1),
          readableLight("Slot 3" + idless, "enclosure/0:0:8:0/3", 1)}));
  EXPECT_EQ(instrumentationLines(), std::vector<std::string>{kGarbageLine});
}

TEST_F(EnclosureProviderTest, ALightIsFoundByItsDeviceId) {
  const std::string elementName = "SLOT 01 locate light, enclosure 0x500605b0000272bf";
  EXPECT_EQ(provider_->get(kSystemName, elementName + ":enclosure/0x500605b0000272bf/1"),
            readableLight(elementName, "enclosure/0x500605b0000272bf/1", 3));
}

}  // namespace
