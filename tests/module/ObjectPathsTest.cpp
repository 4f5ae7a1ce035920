// Object paths of the lights and of the capabilities record.
#include "FactoryFixture.h"

namespace factorytest {
namespace {

using cmpihost::CreatingFunction;
using cmpihost::Fault;
using cmpihost::ObjectPathValue;
using cmpihost::StatusValue;
using cmpihost::Value;
using testsupport::blueLight;

const std::string kPathsList = " broker=PTR ref=PTR objectPaths=PTR status=PTR";

ObjectPathValue lightPath(const std::string& deviceID, const std::string& nameSpace = kNameSpace) {
  ObjectPathValue path(nameSpace, "KESTA_BlueLight");
  path.setHost(kSystemName);
  path.addKey("CreationClassName", Value("KESTA_BlueLight"));
  path.addKey("DeviceID", Value(deviceID));
  path.addKey("SystemCreationClassName", Value("KESTA_ComputerSystem"));
  path.addKey("SystemName", Value(kSystemName));
  return path;
}

TEST_F(FactoryTest, NoLightsGiveNoPathsAndAnInfoTrace) {
  useTree({});
  BlueLightFactory factory(true, false);
  std::vector<CMPIObjectPath*> paths;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref(), paths, &status), 1);
  EXPECT_TRUE(paths.empty());
  EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_EQ(status.msg, nullptr);
  EXPECT_EQ(factoryLog(),
            (std::vector<std::string>{entering("getAllBlueLightCMPIObjPaths", kPathsList)}));
  EXPECT_EQ(factoryLog("TRACE"), factoryLog());
  EXPECT_EQ(brokerTraces(), (std::vector<cmpihost::TraceRecord>{brokerTrace(
                                1, "BlueLightProfileProvider", "***No instance found***")}));
}

TEST_F(FactoryTest, NoCapabilitiesGiveNoPathsAndAWarningTrace) {
  BlueLightFactory factory(false, false);
  std::vector<CMPIObjectPath*> paths;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb(), ref(), paths, &status), 1);
  EXPECT_TRUE(paths.empty());
  EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_EQ(
      factoryLog(),
      (std::vector<std::string>{entering("getAllBlueLightCapabilitiesCMPIObjPaths", kPathsList)}));
  EXPECT_EQ(brokerTraces(), (std::vector<cmpihost::TraceRecord>{brokerTrace(
                                2, "BlueLightCapabilitiesProvider", "***No instance found***")}));
}

TEST_F(FactoryTest, TwoLightsGiveTwoPathsInDeviceIDOrderWithFourKeys) {
  useTree({blueLight("2.1"), blueLight("1.7")});
  BlueLightFactory factory(true, false);
  std::vector<CMPIObjectPath*> paths;
  CMPIStatus status = untouchedStatus();
  ASSERT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref("KESTA_BlueLight", "root/test"), paths,
                                                &status),
            0);
  ASSERT_EQ(paths.size(), 2u);
  EXPECT_EQ(snapshot(paths[0]), lightPath("Blue Light:1.7", "root/test"));
  EXPECT_EQ(snapshot(paths[1]), lightPath("Blue Light:2.1", "root/test"));
  EXPECT_EQ(status.rc, CMPI_RC_OK);
  EXPECT_EQ(factoryLog(),
            (std::vector<std::string>{entering("getAllBlueLightCMPIObjPaths", kPathsList),
                                      exiting("getAllBlueLightCMPIObjPaths", kPathsList)}));
  EXPECT_EQ(factoryLog("TRACE"), factoryLog());
  EXPECT_TRUE(brokerTraces().empty());
}

TEST_F(FactoryTest, TheClassOfRefDoesNotMatterOnlyItsNamespace) {
  useTree({blueLight("1")});
  BlueLightFactory factory(true, true);
  std::vector<CMPIObjectPath*> paths;
  ASSERT_EQ(
      factory.getAllBlueLightCMPIObjPaths(mb(), ref("Other_Class", "interop"), paths, nullptr), 0);
  ASSERT_EQ(paths.size(), 1u);
  EXPECT_EQ(snapshot(paths[0]), lightPath("Blue Light:1", "interop"));
}

TEST_F(FactoryTest, PathsAreAppendedNotReplaced) {
  useTree({blueLight("1")});
  BlueLightFactory factory(true, false);
  std::vector<CMPIObjectPath*> paths;
  ASSERT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref(), paths, nullptr), 0);
  ASSERT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref(), paths, nullptr), 0);
  EXPECT_EQ(paths.size(), 2u);
}

TEST_F(FactoryTest, PathFailureOnTheSecondLight) {
  useTree({blueLight("1"), blueLight("2"), blueLight("3")});
  BlueLightFactory factory(true, false);
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 2));
  std::vector<CMPIObjectPath*> paths;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref(), paths, &status), 2);
  ASSERT_EQ(paths.size(), 1u);
  EXPECT_EQ(snapshot(paths[0]), lightPath("Blue Light:1"));
  EXPECT_EQ(cmpihost::toStatusValue(status),
            StatusValue(CMPI_RC_ERR_FAILED, std::string("Create CMPIObjectPath failed.")));
  EXPECT_EQ(brokerTraces(),
            (std::vector<cmpihost::TraceRecord>{brokerTrace(
                2, "BlueLightProfileProvider",
                "Create CMPIObjectPath                     failed for RecordLogClass.")}));
  // No exit line after a failure.
  EXPECT_EQ(factoryLog(),
            (std::vector<std::string>{entering("getAllBlueLightCMPIObjPaths", kPathsList)}));
}

TEST_F(FactoryTest, PathWithoutHandleIsAFailureToo) {
  useTree({blueLight("1")});
  BlueLightFactory factory(true, false);
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewObjectPath, 1));
  std::vector<CMPIObjectPath*> paths;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref(), paths, &status), 2);
  EXPECT_TRUE(paths.empty());
  EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
}

TEST_F(FactoryTest, PathFailureWithNullStatusStillTracesAndFails) {
  useTree({blueLight("1")});
  BlueLightFactory factory(true, false);
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
  std::vector<CMPIObjectPath*> paths;
  EXPECT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref(), paths, nullptr), 2);
  EXPECT_EQ(brokerTraces().size(), 1u);
  EXPECT_EQ(factoryLog(),
            (std::vector<std::string>{entering("getAllBlueLightCMPIObjPaths",
                                               " broker=PTR ref=PTR objectPaths=PTR status=0")}));
  // No status text was made for nobody to read.
  for (const auto& call : broker_.calls()) EXPECT_NE(call.function, "newString");
}

TEST_F(FactoryTest, BrokerStatusOfAFailedCreationIsReplaced) {
  useTree({blueLight("1")});
  BlueLightFactory factory(true, false);
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewObjectPath, 1,
                                      StatusValue(CMPI_RC_ERR_INVALID_NAMESPACE)));
  std::vector<CMPIObjectPath*> paths;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref(), paths, &status), 2);
  EXPECT_EQ(cmpihost::toStatusValue(status),
            StatusValue(CMPI_RC_ERR_FAILED, std::string("Create CMPIObjectPath failed.")));
}

TEST_F(FactoryTest, CapabilitiesPathHasOneKeyAndTheHost) {
  BlueLightFactory factory(false, true);
  std::vector<CMPIObjectPath*> paths;
  CMPIStatus status = untouchedStatus();
  ASSERT_EQ(factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb(), ref(), paths, &status), 0);
  ASSERT_EQ(paths.size(), 1u);
  ObjectPathValue expected(kNameSpace, "KESTA_BlueLightCapabilities");
  expected.setHost(kSystemName);
  expected.addKey("InstanceID", Value("KESTA:BlueLightCapabilities1"));
  EXPECT_EQ(snapshot(paths[0]), expected);
  EXPECT_EQ(factoryLog(), (std::vector<std::string>{
                              entering("getAllBlueLightCapabilitiesCMPIObjPaths", kPathsList),
                              exiting("getAllBlueLightCapabilitiesCMPIObjPaths", kPathsList)}));
}

TEST_F(FactoryTest, CapabilitiesPathFailureHasItsOwnTexts) {
  BlueLightFactory factory(false, true);
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
  std::vector<CMPIObjectPath*> paths;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb(), ref(), paths, &status), 2);
  EXPECT_TRUE(paths.empty());
  EXPECT_EQ(cmpihost::toStatusValue(status),
            StatusValue(CMPI_RC_ERR_FAILED, std::string("Create CMPIObjectPath failed")));
  EXPECT_EQ(brokerTraces(),
            (std::vector<cmpihost::TraceRecord>{brokerTrace(
                2, "BlueLightCapabilitiesProvider",
                "Create CMPIObjectPath failed for                     BlueLightCapabilities "
                "class")}));
  EXPECT_EQ(factoryLog().size(), 1u);
}

TEST_F(FactoryTest, SystemNameIsReadForTheHostAndAgainForTheKey) {
  useTree({blueLight("1")});
  BlueLightFactory factory(true, false);
  std::vector<CMPIObjectPath*> paths;
  ASSERT_EQ(factory.getAllBlueLightCMPIObjPaths(mb(), ref(), paths, nullptr), 0);
  // The broker saw the name as the host and as the SystemName key.
  std::vector<std::string> seen;
  for (const auto& call : broker_.calls()) {
    if (call.function == "setHostname" || call.function == "addKey")
      seen.push_back(call.toString());
  }
  ASSERT_EQ(seen.size(), 5u);
  EXPECT_NE(seen[0].find(kSystemName), std::string::npos) << seen[0];
  EXPECT_NE(seen[4].find("SystemName"), std::string::npos) << seen[4];
  EXPECT_NE(seen[4].find(kSystemName), std::string::npos) << seen[4];
}

}  // namespace
}  // namespace factorytest
