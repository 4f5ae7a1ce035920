// The collector: instrumentation nodes read into light records, and the capabilities record.
#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "BlueLight.h"
#include "KestaInstrumentation.h"
#include "TestSupport.h"

namespace {

using Kesta::BlueLightProvider::BlueLight;
using Kesta::BlueLightProvider::BlueLightCapabilities;
using Kesta::BlueLightProvider::getBlueLightCapabilitiesInstances;
using Kesta::BlueLightProvider::getBlueLightInstances;
using testsupport::blueLight;
using testsupport::LogCapture;
using testsupport::Node;
using testsupport::ScopedEnv;
using testsupport::TempDir;
using Status = std::vector<unsigned short>;

const std::string kCategory = "Varnel.BlueLight";

class CollectorTest : public ::testing::Test {
 protected:
  // Points the instrumentation at a tree of `nodes`.
  void useTree(const std::vector<Node>& nodes) {
    testsupport::writeTree(tree_, nodes);
    source_.emplace("KESTA_INSTRUMENTATION", "file:" + tree_);
  }
  void useSource(const std::string& source) { source_.emplace("KESTA_INSTRUMENTATION", source); }

  TempDir dir_;
  std::string tree_ = dir_.file("tree.json");
  std::optional<ScopedEnv> source_;
  LogCapture log_;
};

TEST_F(CollectorTest, TreeWithoutBlueLightsGivesNothingAndBothTraces) {
  Node other;
  other.type = 7;
  other.path = "1.1";
  other.description = "Fan";
  useTree({other});
  std::vector<BlueLight> lights;
  EXPECT_EQ(getBlueLightInstances(lights), 0);
  EXPECT_TRUE(lights.empty());

  const auto texts = log_.texts(kCategory, "LOG");
  ASSERT_EQ(texts.size(), 2u);
  EXPECT_EQ(testsupport::maskPointers(testsupport::maskLineNumbers(texts[0])),
            "ENTERING: setVector() in BlueLight.cpp [Line: N],Parameters List:  "
            "vectBlueLight=PTR instrumentation=PTR");
  EXPECT_EQ(testsupport::maskPointers(testsupport::maskLineNumbers(texts[1])),
            "EXITING: setVector() in BlueLight.cpp [Line: N],Parameters List:  "
            "vectBlueLight=PTR instrumentation=PTR");
  EXPECT_EQ(log_.texts(kCategory, "TRACE"), texts);
  for (const auto& line : log_.lines(kCategory)) EXPECT_EQ(line.level, 3000);
}

TEST_F(CollectorTest, ParameterListCarriesTheVectorAddress) {
  useTree({});
  std::vector<BlueLight> lights;
  getBlueLightInstances(lights);
  std::ostringstream address;
  address << static_cast<const void*>(&lights);
  const auto texts = log_.texts(kCategory, "LOG");
  ASSERT_FALSE(texts.empty());
  EXPECT_NE(texts[0].find(" vectBlueLight=" + address.str() + " instrumentation=0x"),
            std::string::npos)
      << texts[0];
}

TEST_F(CollectorTest, EmptyTreeIsNotAnError) {
  useTree({});
  std::vector<BlueLight> lights;
  EXPECT_EQ(getBlueLightInstances(lights), 0);
  EXPECT_TRUE(lights.empty());
}

TEST_F(CollectorTest, DeviceIDJoinsDescriptionAndPath) {
  useTree({blueLight("1.2")});
  std::vector<BlueLight> lights;
  ASSERT_EQ(getBlueLightInstances(lights), 0);
  ASSERT_EQ(lights.size(), 1u);
  EXPECT_EQ(lights[0].getDeviceID(), "Blue Light:1.2");
  EXPECT_EQ(lights[0].getElementName(), "Blue Light");
}

TEST_F(CollectorTest, BlanksAroundTheDescriptionAreKeptInTheFields) {
  useTree({blueLight("3", 1u, 2u, "  Blue Light  ")});
  std::vector<BlueLight> lights;
  ASSERT_EQ(getBlueLightInstances(lights), 0);
  ASSERT_EQ(lights.size(), 1u);
  EXPECT_EQ(lights[0].deviceID, "  Blue Light  :3");
  EXPECT_EQ(lights[0].getDeviceID(), "Blue Light  :3");
  EXPECT_EQ(lights[0].elementName, "  Blue Light  ");
  EXPECT_EQ(lights[0].getElementName(), "Blue Light");
}

TEST_F(CollectorTest, EmptyDescriptionStopsTheWalk) {
  useTree({blueLight("1"), blueLight("2", 1u, 2u, ""), blueLight("3")});
  std::vector<BlueLight> lights;
  EXPECT_EQ(getBlueLightInstances(lights), 1);
  ASSERT_EQ(lights.size(), 1u);
  EXPECT_EQ(lights[0].getDeviceID(), "Blue Light:1");
  // The walk ended by an exception writes no exit line.
  const auto texts = log_.texts(kCategory, "LOG");
  ASSERT_EQ(texts.size(), 1u);
  EXPECT_EQ(texts[0].rfind("ENTERING: setVector()", 0), 0u);
}

TEST_F(CollectorTest, RecordsAppendToWhatTheVectorHeld) {
  useTree({blueLight("1")});
  std::vector<BlueLight> lights(2);
  EXPECT_EQ(getBlueLightInstances(lights), 0);
  EXPECT_EQ(lights.size(), 3u);
  EXPECT_EQ(lights[2].getDeviceID(), "Blue Light:1");
}

TEST_F(CollectorTest, DegradedNodeWithPredictedFailure) {
  useTree({blueLight("5", 20u)});
  std::vector<BlueLight> lights;
  ASSERT_EQ(getBlueLightInstances(lights), 0);
  ASSERT_EQ(lights.size(), 1u);
  const BlueLight& light = lights[0];
  EXPECT_EQ(light.getOperationalStatus(), (Status{3, 5}));
  EXPECT_EQ(light.getHealthState(), 10);
  EXPECT_EQ(light.getRequestedState(), 2);
  EXPECT_FALSE(light.getAudibleAlarm());
  EXPECT_TRUE(light.getVisibleAlarm());
  EXPECT_FALSE(light.getMotionAlarm());
}

TEST_F(CollectorTest, StatusZeroKeepsDefaultsButRequestedStateIsEnabled) {
  useTree({blueLight("6", 0u), blueLight("7", std::nullopt)});
  std::vector<BlueLight> lights;
  ASSERT_EQ(getBlueLightInstances(lights), 0);
  ASSERT_EQ(lights.size(), 2u);
  for (const BlueLight& light : lights) {
    EXPECT_TRUE(light.getOperationalStatus().empty());
    EXPECT_EQ(light.getHealthState(), 0);
    EXPECT_EQ(light.getRequestedState(), 2);
    EXPECT_TRUE(light.getVisibleAlarm());
  }
}

TEST_F(CollectorTest, UnknownStatusGivesUnknownValues) {
  useTree({blueLight("8", 27u)});
  std::vector<BlueLight> lights;
  ASSERT_EQ(getBlueLightInstances(lights), 0);
  EXPECT_EQ(lights.at(0).getOperationalStatus(), (Status{0}));
  EXPECT_EQ(lights.at(0).getHealthState(), 0);
  EXPECT_EQ(lights.at(0).getRequestedState(), 2);
}

TEST_F(CollectorTest, AlarmStateFromTheProperty) {
  Node big = blueLight("4", 1u, 65538u);  // the low 16 bits read 2
  useTree({blueLight("1", 1u, 2u), blueLight("2", 1u, 7u), blueLight("3", 1u, std::nullopt), big});
  std::vector<BlueLight> lights;
  ASSERT_EQ(getBlueLightInstances(lights), 0);
  ASSERT_EQ(lights.size(), 4u);
  EXPECT_EQ(lights[0].getAlarmState(), 2);
  EXPECT_EQ(lights[1].getAlarmState(), 0);
  EXPECT_EQ(lights[2].getAlarmState(), 0);
  EXPECT_EQ(lights[3].getAlarmState(), 2);
}

TEST_F(CollectorTest, OtherNodeTypesAreSkippedAndOrderIsKept) {
  Node fan;
  fan.type = 9;
  fan.path = "0.1";
  fan.description = "Fan";
  useTree({blueLight("9"), fan, blueLight("2"), blueLight("5")});
  std::vector<BlueLight> lights;
  ASSERT_EQ(getBlueLightInstances(lights), 0);
  ASSERT_EQ(lights.size(), 3u);
  EXPECT_EQ(lights[0].getDeviceID(), "Blue Light:9");
  EXPECT_EQ(lights[1].getDeviceID(), "Blue Light:2");
  EXPECT_EQ(lights[2].getDeviceID(), "Blue Light:5");
}

TEST_F(CollectorTest, SixtyFiveThousandFiveHundredThirtySevenLights) {
  testsupport::writeLightTree(tree_, 65537);
  useSource("file:" + tree_);
  std::vector<BlueLight> lights;
  ASSERT_EQ(getBlueLightInstances(lights), 0);
  ASSERT_EQ(lights.size(), 65537u);
  EXPECT_EQ(lights.front().getDeviceID(), "Blue Light:1.1");
  EXPECT_EQ(lights.back().getDeviceID(), "Blue Light:1.65537");
}

TEST_F(CollectorTest, MissingSourceIsAFailureWithOneLogLine) {
  useSource("file:" + dir_.file("does-not-exist.json"));
  std::vector<BlueLight> lights;
  EXPECT_EQ(getBlueLightInstances(lights), 1);
  EXPECT_TRUE(lights.empty());
  // Nothing of the module's own; the platform says what went wrong, once, at level 6000.
  EXPECT_TRUE(log_.lines(kCategory).empty());
  int failures = 0;
  for (const auto& line : log_.lines()) {
    if (line.level == 6000) {
      ++failures;
      EXPECT_NE(line.text.find("does-not-exist.json"), std::string::npos) << line.text;
    }
  }
  EXPECT_EQ(failures, 1);
}

TEST_F(CollectorTest, MalformedSourcesAreFailures) {
  const std::vector<std::string> texts = {
      "{\"nodes\": [",                                                               // truncated
      "{\"nodes\": {}}",                                                             // not a list
      "[]",                                                                          // no object
      "{\"nodes\": [{\"type\": \"26\", \"path\": \"1\", \"description\": \"x\"}]}",  // wrong type
      "{\"nodes\": [{\"type\": 26, \"description\": \"x\"}]}",                       // no path
      "{\"nodes\": [{\"type\": 26, \"path\": \"1\", \"description\": \"\xff\xfe\"}]}",  // not UTF-8
      "{\"nodes\": [{\"type\": 26, \"path\": \"1\", \"description\": \"x\", \"status\": -1}]}",
  };
  for (const std::string& text : texts) {
    testsupport::writeFile(tree_, text);
    useSource("file:" + tree_);
    log_.clear();
    std::vector<BlueLight> lights;
    EXPECT_EQ(getBlueLightInstances(lights), 1) << text;
    EXPECT_TRUE(lights.empty()) << text;
    int failures = 0;
    for (const auto& line : log_.lines()) failures += line.level == 6000 ? 1 : 0;
    EXPECT_EQ(failures, 1) << text;
  }
}

TEST_F(CollectorTest, AChangedSourceIsReadAtTheNextCollection) {
  useTree({blueLight("1")});
  std::vector<BlueLight> first;
  ASSERT_EQ(getBlueLightInstances(first), 0);
  useTree({blueLight("1"), blueLight("2")});
  std::vector<BlueLight> second;
  ASSERT_EQ(getBlueLightInstances(second), 0);
  EXPECT_EQ(first.size(), 1u);
  EXPECT_EQ(second.size(), 2u);
}

TEST(CapabilitiesCollector, AppendsOneDefaultRecord) {
  std::vector<BlueLightCapabilities> records;
  EXPECT_EQ(getBlueLightCapabilitiesInstances(records), 0);
  ASSERT_EQ(records.size(), 1u);
  EXPECT_EQ(records[0].instanceID, "");
  EXPECT_TRUE(records[0].alarmStatesSupported.empty());
  EXPECT_EQ(getBlueLightCapabilitiesInstances(records), 0);
  EXPECT_EQ(records.size(), 2u);
}

TEST(CapabilitiesCollector, WritesNoTrace) {
  LogCapture log;
  std::vector<BlueLightCapabilities> records;
  getBlueLightCapabilitiesInstances(records);
  EXPECT_TRUE(log.lines().empty());
}

}  // namespace
