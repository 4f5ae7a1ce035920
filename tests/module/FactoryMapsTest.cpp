// Construction of the factory and the maps it files its records in.
#include "FactoryFixture.h"

namespace factorytest {
namespace {

using testsupport::blueLight;
using I = BlueLightFactoryInspector;

TEST_F(FactoryTest, CollectsNothingWithoutFlags) {
  useTree({blueLight("1"), blueLight("2")});
  BlueLightFactory factory(false, false);
  EXPECT_EQ(factory.getNumberOfInstances(), 0);
  EXPECT_TRUE(I::lights(factory).empty());
  EXPECT_TRUE(I::capabilities(factory).empty());

  std::vector<CMPIObjectPath*> paths;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref(), paths, &status), 1);
  EXPECT_EQ(factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb(), ref(), paths, &status), 1);
  EXPECT_TRUE(paths.empty());
  std::vector<CMPIInstance*> instances;
  EXPECT_EQ(factory.getAllBlueLightCMPIInstances(mb(), ref(), nullptr, false, instances, &status),
            0);
  EXPECT_EQ(factory.getAllBlueLightCapabilitiesCMPIInstances(mb(), ref(), nullptr, false, instances,
                                                             &status),
            0);
  EXPECT_TRUE(instances.empty());
  EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
}

TEST_F(FactoryTest, DefaultConstructedFactoryIsEmpty) {
  useTree({blueLight("1")});
  BlueLightFactory factory;
  EXPECT_EQ(factory.getNumberOfInstances(), 0);
  EXPECT_TRUE(I::lightMap(factory).empty());
  EXPECT_TRUE(I::capabilitiesMap(factory).empty());
}

TEST_F(FactoryTest, LightsAreFiledByStrippedDeviceID) {
  useTree({blueLight("9"), blueLight("1"), blueLight("5")});
  BlueLightFactory factory(true, false);
  EXPECT_EQ(factory.getNumberOfInstances(), 3);
  ASSERT_EQ(I::lights(factory).size(), 3u);
  EXPECT_EQ(I::lights(factory)[0].getDeviceID(), "Blue Light:9");  // collector order
  std::vector<std::string> keys;
  for (const auto& entry : I::lightMap(factory)) keys.push_back(entry.first);
  EXPECT_EQ(keys, (std::vector<std::string>{"Blue Light:1", "Blue Light:5", "Blue Light:9"}));
  EXPECT_TRUE(I::capabilitiesMap(factory).empty());
}

TEST_F(FactoryTest, LightsDifferingOnlyInSurroundingBlanksShareOneEntryTheLaterWins) {
  useTree({blueLight("1", 1u, 1u, " Blue Light"), blueLight("1", 20u, 3u, "Blue Light")});
  BlueLightFactory factory(true, false);
  ASSERT_EQ(I::lights(factory).size(), 2u);
  ASSERT_EQ(I::lightMap(factory).size(), 1u);
  EXPECT_EQ(factory.getNumberOfInstances(), 1);
  const BlueLight& kept = I::lightMap(factory).at("Blue Light:1");
  EXPECT_EQ(kept.getAlarmState(), 3);
  EXPECT_EQ(kept.getHealthState(), 10);
}

TEST_F(FactoryTest, ThreeCapabilitiesRecordsGiveOneEntryHoldingTheThird) {
  BlueLightFactory factory(false, false);
  for (unsigned short mark = 1; mark <= 3; ++mark) {
    BlueLightCapabilities record;
    record.spareStates.push_back(mark);
    I::capabilities(factory).push_back(record);
  }
  I::createCapabilitiesMap(factory);
  ASSERT_EQ(I::capabilitiesMap(factory).size(), 1u);
  const auto& entry = *I::capabilitiesMap(factory).begin();
  EXPECT_EQ(entry.first, "KESTA:BlueLightCapabilities1");
  EXPECT_EQ(entry.second.spareStates, (std::vector<unsigned short>{3}));
  EXPECT_EQ(entry.second.instanceID, "KESTA:BlueLightCapabilities1");
  // Capabilities are not lights.
  EXPECT_EQ(factory.getNumberOfInstances(), 0);
}

TEST_F(FactoryTest, CapabilitiesOnlyFactoryCountsNoLights) {
  useTree({blueLight("1")});
  BlueLightFactory factory(false, true);
  EXPECT_EQ(factory.getNumberOfInstances(), 0);
  EXPECT_TRUE(I::lights(factory).empty());
  ASSERT_EQ(I::capabilitiesMap(factory).size(), 1u);
  EXPECT_EQ(I::capabilitiesMap(factory).begin()->first, "KESTA:BlueLightCapabilities1");
}

TEST_F(FactoryTest, FailedCollectionKeepsTheRecordsButFilesNothing) {
  useTree({blueLight("1"), blueLight("2", 1u, 2u, ""), blueLight("3")});
  BlueLightFactory factory(true, true);
  EXPECT_EQ(I::lights(factory).size(), 1u);
  EXPECT_TRUE(I::lightMap(factory).empty());
  EXPECT_EQ(factory.getNumberOfInstances(), 0);
  // The capabilities are collected all the same.
  EXPECT_EQ(I::capabilitiesMap(factory).size(), 1u);
  // Nothing is reported: no line of the factory, no broker trace.
  EXPECT_TRUE(factoryLog().empty());
  EXPECT_TRUE(brokerTraces().empty());
}

TEST_F(FactoryTest, UnreadableTreeGivesAnEmptyMap) {
  source_.emplace("KESTA_INSTRUMENTATION", "file:" + dir_.file("missing.json"));
  BlueLightFactory factory(true, false);
  EXPECT_EQ(factory.getNumberOfInstances(), 0);
  EXPECT_TRUE(I::lightMap(factory).empty());
}

TEST_F(FactoryTest, CountsAreSixteenBitSoOnlyTheRemainderIsFiled) {
  testsupport::writeLightTree(tree_, 65537);
  source_.emplace("KESTA_INSTRUMENTATION", "file:" + tree_);
  BlueLightFactory factory(true, false);
  EXPECT_EQ(I::lights(factory).size(), 65537u);
  ASSERT_EQ(I::lightMap(factory).size(), 1u);
  EXPECT_EQ(I::lightMap(factory).begin()->first, "Blue Light:1.1");
  EXPECT_EQ(factory.getNumberOfInstances(), 1);
}

TEST_F(FactoryTest, SixtyFiveThousandFiveHundredThirtyFiveLightsAreAllFiled) {
  testsupport::writeLightTree(tree_, 65535);
  source_.emplace("KESTA_INSTRUMENTATION", "file:" + tree_);
  BlueLightFactory factory(true, false);
  EXPECT_EQ(I::lightMap(factory).size(), 65535u);
  EXPECT_EQ(factory.getNumberOfInstances(), 65535);
}

TEST_F(FactoryTest, NumberOfInstancesIsCutToSixteenBits) {
  BlueLightFactory factory(false, false);
  for (unsigned i = 0; i < 65536 + 5; ++i) {
    I::lightMap(factory)["light " + std::to_string(i)] = BlueLight();
  }
  EXPECT_EQ(factory.getNumberOfInstances(), 5);
}

}  // namespace
}  // namespace factorytest
