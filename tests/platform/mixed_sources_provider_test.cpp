// KESTA_BlueLight as a WBEM client sees it when the provider reads several kinds of source in one
// walk: a JSON snapshot, the kernel's enclosure class and its LED class, named in a list and
// found by auto. The built provider library is loaded into the in-process host; every light is
// compared whole, names, states and DeviceIDs, so that a source that lost or changed a light, or
// lights that came in another order, would show.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <memory>
#include <optional>
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
using testsupport::TempDir;

const std::string kEnclosureClass =
    std::string(PLATFORM_TEST_FIXTURES) + "/enclosure/sys/class/enclosure";
const std::string kSystemName = "mixed-sources-host";

// `lights` in the order the provider hands them over whatever source they came from: by DeviceID,
// byte by byte.
std::vector<LightSeen> inDeviceIdOrder(std::vector<LightSeen> lights) {
  std::sort(lights.begin(), lights.end(),
            [](const LightSeen& a, const LightSeen& b) { return a.deviceId < b.deviceId; });
  return lights;
}

// The lights of the committed enclosure tree (enclosure_source_test.cpp describes it), in the
// order the source walks them.
std::vector<LightSeen> enclosureLights() {
  const std::string shelf = " locate light, enclosure 0x500605b0000272bf";
  const std::string idless = " locate light, enclosure 0:0:8:0";
  return {readableLight("ArrayDevice05" + shelf, "enclosure/0x500605b0000272bf/ArrayDevice05", 1),
          readableLight("SLOT 01" + shelf, "enclosure/0x500605b0000272bf/1", 3),
          readableLight("SLOT 02" + shelf, "enclosure/0x500605b0000272bf/2", 1),
          // `locate` holds 2: degraded, and no alarm state (the provider shows 0).
          {"SLOT 10" + shelf + ":enclosure/0x500605b0000272bf/10", "SLOT 10" + shelf, 0, 10, {3}},
          readableLight("Slot 0" + idless, "enclosure/0:0:8:0/0", 1),
          readableLight("Slot 1" + idless, "enclosure/0:0:8:0/1", 3),
          readableLight("Slot 10" + idless, "enclosure/0:0:8:0/10", 1),
          readableLight("Slot 3" + idless, "enclosure/0:0:8:0/3", 1)};
}

// The one log line of the enclosure tree: the bay whose `locate` holds 2, as named by `source`.
std::string garbageLine(const std::string& source) {
  return "Instrumentation source \"" + source +
         "\" cannot read the locate light of \"SLOT 10 locate light, enclosure "
         "0x500605b0000272bf\": it holds \"2\", not 0 or 1";
}

// An LED class directory under `root`: a blinking identify LED, a lit blue status LED and a caps
// lock LED (neither blue nor an identifier).
std::string writeLedClass(const TempDir& root) {
  std::string leds = root.file("sys/class/leds");
  const auto led = [&](const std::string& name, const std::string& trigger,
                       const std::string& brightness) {
    std::filesystem::create_directories(leds + "/" + name);
    testsupport::writeFile(leds + "/" + name + "/trigger", trigger + "\n");
    testsupport::writeFile(leds + "/" + name + "/brightness", brightness + "\n");
  };
  led("server::uid", "none timer [heartbeat]", "0");
  led("platform:blue:status", "[none] timer", "255");
  led("input3::capslock", "[none] kbd-capslock", "0");
  return leds;
}

class MixedSourcesTest : public ::testing::Test {
 protected:
  // Loads the provider with KESTA_INSTRUMENTATION set to `source` (and the environment the test
  // set before).
  void load(const std::string& source) {
    source_.emplace("KESTA_INSTRUMENTATION", source);
    // The library's logger reads the environment at its first line, so the capture comes first.
    capture_ = std::make_unique<LogCapture>(6000);
    provider_ = std::make_unique<LoadedProvider>(PLATFORM_TEST_PROVIDER_LIBRARY);
    ASSERT_TRUE(provider_->loaded());
  }

  std::vector<LightSeen> enumerate() { return provider_->enumerate(); }
  std::optional<LightSeen> get(const std::string& deviceId) {
    return provider_->get(kSystemName, deviceId);
  }

  std::vector<std::string> instrumentationLines() const {
    return capture_->texts("Kesta.Platform.Instrumentation", "LOG");
  }

  TempDir scratch_;
  ScopedEnv systemName_{"KESTA_SYSTEM_NAME", kSystemName};
  std::optional<ScopedEnv> source_;
  std::unique_ptr<LogCapture> capture_;
  std::unique_ptr<LoadedProvider> provider_;
};

TEST_F(MixedSourcesTest, AListGivesTheLightsOfEverySourceInOneEnumeration) {
  const std::string tree = scratch_.file("tree.json");
  testsupport::writeTree(tree, {testsupport::blueLight("1.1", 1u, 2u, "Front Panel Light")});
  const std::string leds = writeLedClass(scratch_);
  const std::string enclosure = "enclosure:" + kEnclosureClass;
  load("file:" + tree + ";" + enclosure + ";sysfs:" + leds);

  // Without a lights= option the LED class gives its blue LEDs and its identify LEDs.
  const std::vector<LightSeen> bays = enclosureLights();
  std::vector<LightSeen> expected = {readableLight("Front Panel Light", "1.1", 2)};
  expected.insert(expected.end(), bays.begin(), bays.end());
  expected.push_back(readableLight("Blue Light", "platform:blue:status", 2));
  expected.push_back(readableLight("Blue Light", "server::uid", 3));
  EXPECT_EQ(enumerate(), inDeviceIdOrder(expected));
  EXPECT_EQ(instrumentationLines(), std::vector<std::string>{garbageLine(enclosure)});

  // Each light is found by its DeviceID whichever source it came from.
  EXPECT_EQ(get("Front Panel Light:1.1"), readableLight("Front Panel Light", "1.1", 2));
  EXPECT_EQ(get("Blue Light:server::uid"), readableLight("Blue Light", "server::uid", 3));
  EXPECT_EQ(get(bays[1].deviceId), bays[1]);
  EXPECT_EQ(get("Blue Light:input3::capslock"), std::nullopt);
}

TEST_F(MixedSourcesTest, AutoFindsTheEnclosuresAndTheIdentifyLedsUnderTheDiscoveryRoot) {
  // A machine without an IPMI device, with the committed enclosure class and an LED class.
  std::filesystem::create_directories(scratch_.file("sys/class"));
  std::filesystem::create_directory_symlink(kEnclosureClass, scratch_.file("sys/class/enclosure"));
  writeLedClass(scratch_);
  ScopedEnv root("KESTA_DISCOVERY_ROOT", scratch_.path());
  load("auto");

  // auto reads the LED class for identify LEDs only: the blue status LED is no light here.
  std::vector<LightSeen> expected = enclosureLights();
  expected.push_back(readableLight("Blue Light", "server::uid", 3));
  EXPECT_EQ(enumerate(), inDeviceIdOrder(expected));
  EXPECT_EQ(instrumentationLines(), std::vector<std::string>{garbageLine(
                                        "enclosure:" + scratch_.path() + "/sys/class/enclosure")});
  EXPECT_EQ(get("Blue Light:platform:blue:status"), std::nullopt);
}

TEST_F(MixedSourcesTest, AutoOnAMachineWithNoneOfItsSourcesGivesNoLightAndNoLine) {
  ScopedEnv root("KESTA_DISCOVERY_ROOT", scratch_.path());
  load("auto");
  EXPECT_EQ(enumerate(), std::vector<LightSeen>{});
  EXPECT_EQ(instrumentationLines(), std::vector<std::string>{});
}

}  // namespace
