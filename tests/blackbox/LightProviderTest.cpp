// The KESTA_BlueLight instance provider through the loaded library: EnumerateInstanceNames,
// EnumerateInstances and GetInstance, checked through what the host records and through the
// provider's log.
#include <cmpimacs.h>

#include <cstring>
#include <string>
#include <vector>

#include "BlackboxFixture.h"
#include "ExactKeyPath.h"

namespace blackbox {
namespace {

using cmpihost::CreatingFunction;
using cmpihost::Fault;
using cmpihost::InstanceValue;
using cmpihost::ObjectPathValue;
using cmpihost::Outcome;
using cmpihost::StatusValue;
using cmpihost::Value;
using testsupport::blueLight;
using Texts = std::vector<std::string>;

const std::string kProviderCategory = "Varnel.BlueLightProvider";
const std::string kFactoryCategory = "Varnel.BlueLightObjFactory";
const std::string kCollectorCategory = "Varnel.BlueLight";
const std::string kFile = "BlueLightProvider.cpp";
const std::string kFactoryFile = "BlueLightObjFactory.cpp";

const std::string kNamesList = " mi=PTR ctx=PTR result=PTR ref=PTR";
const std::string kEnumList = " mi=PTR ctx=PTR result=PTR ref=PTR properties=0";
const std::string kEnumListWithProperties = " mi=PTR ctx=PTR result=PTR ref=PTR properties=PTR";
const std::string kGetList = " mi=PTR ctx=PTR result=PTR cop=PTR properties=0";

const std::string kPathsList = " broker=PTR ref=PTR objectPaths=PTR status=PTR";
// The last key of this list has no blank before it.
const std::string kAllList = " broker=PTR ref=PTR properties=0 isObjPath=0 instances=PTRrc=PTR";
const std::string kOneList = " broker=PTR ref=PTR key=PTR properties=0 instances=PTR rc=PTR";
const std::string kMakeList = " broker=PTR ref=PTR bluelight=PTR properties=0 isObjPath=0 rc=PTR";
const std::string kCollectList = " vectBlueLight=PTR instrumentation=PTR";

const Texts kKeys = {"CreationClassName", "DeviceID", "SystemCreationClassName", "SystemName"};
const Texts kAllNames = {"CreationClassName",
                         "DeviceID",
                         "SystemCreationClassName",
                         "SystemName",
                         "Caption",
                         "Description",
                         "Name",
                         "ElementName",
                         "RequestedState",
                         "HealthState",
                         "OperationalStatus",
                         "AudibleAlarm",
                         "VisibleAlarm",
                         "MotionAlarm",
                         "AlarmState"};

const std::string kArrayStatusText =
    "Create Array for Property                         OperationalStatus failed.";
const std::string kArrayTraceText =
    "2 BlueLightProfileProvider: Create Array for Property Operat                        "
    "ionalStatus failed.";
const std::string kPathStatusText = "Create CMPIObjectPath failed.";
const std::string kPathTraceText =
    "2 BlueLightProfileProvider: Create CMPIObjectPath                     failed for "
    "RecordLogClass.";

Texts names(const InstanceValue& instance) {
  Texts texts;
  for (const cmpihost::Property& property : instance.properties()) texts.push_back(property.name);
  return texts;
}

// What a light of this DeviceID shows with every property.
Texts lightProperties(const std::string& deviceID, const std::string& health,
                      const std::string& operational, const std::string& alarmState) {
  return {"CreationClassName = \"KESTA_BlueLight\"",
          "DeviceID = \"" + deviceID + "\"",
          "SystemCreationClassName = \"KESTA_ComputerSystem\"",
          "SystemName = \"bbhost.example\"",
          "Caption = \"Blue Light\"",
          "Description = \"Blue Light\"",
          "Name = \"Blue Light\"",
          "ElementName = \"Blue Light\"",
          "RequestedState = 2",
          "HealthState = " + health,
          "OperationalStatus = " + operational,
          "AudibleAlarm = false",
          "VisibleAlarm = true",
          "MotionAlarm = false",
          "AlarmState = " + alarmState};
}

Texts take(const Texts& all, std::size_t count) {
  return Texts(all.begin(), all.begin() + static_cast<std::ptrdiff_t>(count));
}

Texts callsOf(const Outcome& outcome, const std::string& function) {
  Texts texts;
  for (const cmpihost::CallRecord& call : outcome.calls) {
    if (call.function == function) texts.push_back(call.function);
  }
  return texts;
}

class LightProviderTest : public BlackboxTest {
 protected:
  CMPIInstanceMI* mi() { return instanceMI(kLightProvider); }

  // The provider's own lines, which must reach the log level and the trace level alike, each at
  // level 3000.
  Texts providerLog() const {
    Texts logged = logAtBothLevels(kProviderCategory);
    for (const testsupport::LogLine& line : logLines()) {
      EXPECT_EQ(line.level, 3000) << line;
    }
    return logged;
  }
  Texts factoryLog() const { return logAtBothLevels(kFactoryCategory); }

  // Two lights, reported out of DeviceID order.
  void useTwoLights() { useTree({blueLight("1.2"), blueLight("1.1")}); }

  Outcome getWithExactKeyLookup(const ObjectPathValue& cop) {
    CMPIInstanceMI* instanceMi = mi();
    return cmpihost::run(broker_, [&](cmpihost::Request& request) {
      ExactKeyPath path(request.objectPath(cop));
      return instanceMi->ft->getInstance(instanceMi, request.context(), request.result(),
                                         path.cmpi(), nullptr);
    });
  }
};

// ---- EnumerateInstanceNames -----------------------------------------------------------------

TEST_F(LightProviderTest, EnumInstanceNamesReturnsOnePathPerLightInDeviceIDOrder) {
  useTree({blueLight("1.3"), blueLight("1.10"), blueLight("1.2")});
  const Outcome outcome =
      cmpihost::enumerateInstanceNames(broker_, mi(), classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome),
            (Texts{"ObjectPath Valid", "ObjectPath Valid", "ObjectPath Valid", "Done Valid"}));
  Texts paths;
  for (const ObjectPathValue& path : outcome.paths()) paths.push_back(path.toString());
  EXPECT_EQ(paths,
            (Texts{"//bbhost.example/root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_"
                   "BlueLight\",DeviceID=\"Blue Light:1.10\",SystemCreationClassName=\"KESTA_"
                   "ComputerSystem\",SystemName=\"bbhost.example\"",
                   "//bbhost.example/root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_"
                   "BlueLight\",DeviceID=\"Blue Light:1.2\",SystemCreationClassName=\"KESTA_"
                   "ComputerSystem\",SystemName=\"bbhost.example\"",
                   "//bbhost.example/root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_"
                   "BlueLight\",DeviceID=\"Blue Light:1.3\",SystemCreationClassName=\"KESTA_"
                   "ComputerSystem\",SystemName=\"bbhost.example\""}));
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_EnumInstanceNames", kFile, kNamesList),
                                  exiting("BlueLight_EnumInstanceNames", kFile, kNamesList)}));
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getAllBlueLightCMPIObjPaths", kFactoryFile, kPathsList),
                   exiting("getAllBlueLightCMPIObjPaths", kFactoryFile, kPathsList)}));
}

TEST_F(LightProviderTest, EnumInstanceNamesSetsTheNamespaceOfRefBeforeEachHandOver) {
  useTwoLights();
  const Outcome outcome = cmpihost::enumerateInstanceNames(
      broker_, mi(), classPath("KESTA_BlueLight", "interop/lights"));

  ASSERT_EQ(outcome.paths().size(), 2u);
  for (const ObjectPathValue& path : outcome.paths()) {
    EXPECT_EQ(path.nameSpace(), "interop/lights");
  }
  // The factory sets the namespace of each path it makes; the hand-over sets it again, right
  // before each path goes to the result.
  Texts sequence;
  for (const cmpihost::CallRecord& call : outcome.calls) {
    if (call.function == "setNameSpace" || call.function == "returnObjectPath" ||
        call.function == "returnDone") {
      sequence.push_back(call.function);
    }
  }
  EXPECT_EQ(sequence, (Texts{"setNameSpace", "setNameSpace", "setNameSpace", "returnObjectPath",
                             "setNameSpace", "returnObjectPath", "returnDone"}));
}

TEST_F(LightProviderTest, EnumInstanceNamesWithoutLightsReturnsOkWithoutDoneOrExitLine) {
  const Outcome outcome =
      cmpihost::enumerateInstanceNames(broker_, mi(), classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), (Texts{"1 BlueLightProfileProvider: ***No instance found***"}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_EnumInstanceNames", kFile, kNamesList)}));
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getAllBlueLightCMPIObjPaths", kFactoryFile, kPathsList)}));
  // The instrumentation was read, and found nothing.
  EXPECT_EQ(log(kCollectorCategory), (Texts{entering("setVector", "BlueLight.cpp", kCollectList),
                                            exiting("setVector", "BlueLight.cpp", kCollectList)}));
}

TEST_F(LightProviderTest, EnumInstanceNamesFailsWhenThePathOfTheSecondLightCannotBeMade) {
  useTwoLights();
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 2));
  const Outcome outcome =
      cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kPathStatusText));
  // The first path was made but is not handed over: the operation ends at once.
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (Texts{kPathTraceText}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_EnumInstanceNames", kFile, kNamesList)}));
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getAllBlueLightCMPIObjPaths", kFactoryFile, kPathsList)}));
}

TEST_F(LightProviderTest, EnumInstanceNamesFailsOnAPathWithoutHandle) {
  useTwoLights();
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewObjectPath, 1));
  const Outcome outcome =
      cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kPathStatusText));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (Texts{kPathTraceText}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_EnumInstanceNames", kFile, kNamesList)}));
}

TEST_F(LightProviderTest, EnumInstanceNamesReplacesTheBrokersOwnFailureStatus) {
  useTwoLights();
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewObjectPath, 1,
                                      StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "denied")));
  const Outcome outcome =
      cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kPathStatusText));
  EXPECT_EQ(traces(outcome), (Texts{kPathTraceText}));
}

TEST_F(LightProviderTest, EnumInstanceNamesFailureWithoutAMessageWhenTheStringCannotBeMade) {
  useTwoLights();
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
  broker_.armFault(Fault::nullResult(CreatingFunction::NewString, 1));
  const Outcome outcome =
      cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED));
  EXPECT_EQ(traces(outcome), (Texts{kPathTraceText}));
}

TEST_F(LightProviderTest, EnumInstanceNamesHandsOverAPathThatLostItsHandle) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  // The first setNameSpace is the factory's, the second the hand-over's.
  broker_.armFault(Fault::invalidateHandle(cmpihost::ObjectFunction::pathSetNameSpace(), 2));
  const Outcome outcome =
      cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"ObjectPath NullHandle", "Done Valid"}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_EnumInstanceNames", kFile, kNamesList),
                                  exiting("BlueLight_EnumInstanceNames", kFile, kNamesList)}));
}

// ---- EnumerateInstances ---------------------------------------------------------------------

TEST_F(LightProviderTest, EnumInstancesReturnsLightsInDifferentStatesInDeviceIDOrder) {
  useTree({blueLight("1.4", 1u, 2u), blueLight("1.1", 20u, 3u), blueLight("1.3", 26u, 1u),
           blueLight("1.2", std::nullopt, std::nullopt), blueLight("1.5", 19u, 7u),
           blueLight("1.6", 27u, 0u, "  Blue Light  ")});
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi(), classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.doneCount, 1u);
  ASSERT_EQ(outcome.instances().size(), 6u);
  // Byte-wise order: the blank of the padded description sorts before the colon.
  EXPECT_EQ(propertyTexts(outcome.instances()[0]),
            lightProperties("Blue Light  :1.6", "0", "{0}", "0"));
  EXPECT_EQ(propertyTexts(outcome.instances()[1]),
            lightProperties("Blue Light:1.1", "10", "{3, 5}", "3"));
  EXPECT_EQ(propertyTexts(outcome.instances()[2]),
            lightProperties("Blue Light:1.2", "0", "{}", "0"));
  EXPECT_EQ(propertyTexts(outcome.instances()[3]),
            lightProperties("Blue Light:1.3", "10", "{3}", "1"));
  EXPECT_EQ(propertyTexts(outcome.instances()[4]),
            lightProperties("Blue Light:1.4", "5", "{2, 11}", "2"));
  EXPECT_EQ(propertyTexts(outcome.instances()[5]),
            lightProperties("Blue Light:1.5", "0", "{0}", "0"));
  EXPECT_EQ(handOverKinds(outcome).back(), "Done Valid");
  EXPECT_TRUE(traces(outcome).empty());

  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_EnumInstances", kFile, kEnumList),
                                  exiting("BlueLight_EnumInstances", kFile, kEnumList)}));
  Texts expectedFactory = {entering("getAllBlueLightCMPIInstances", kFactoryFile, kAllList)};
  for (int light = 0; light < 6; ++light) {
    expectedFactory.push_back(entering("makeBlueLightInstance", kFactoryFile, kMakeList));
    expectedFactory.push_back(exiting("makeBlueLightInstance", kFactoryFile, kMakeList));
  }
  expectedFactory.push_back(exiting("getAllBlueLightCMPIInstances", kFactoryFile, kAllList));
  EXPECT_EQ(factoryLog(), expectedFactory);
}

TEST_F(LightProviderTest, EnumInstancesWithoutLightsCallsDoneOnceWithBothLines) {
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi(), classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  // Unlike the name enumeration, no "***No instance found***" trace.
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_EnumInstances", kFile, kEnumList),
                                  exiting("BlueLight_EnumInstances", kFile, kEnumList)}));
  EXPECT_EQ(factoryLog(), (Texts{entering("getAllBlueLightCMPIInstances", kFactoryFile, kAllList),
                                 exiting("getAllBlueLightCMPIInstances", kFactoryFile, kAllList)}));
}

TEST_F(LightProviderTest, EnumInstancesSetsOnlyTheKeysAndTheListedProperties) {
  useTree({blueLight("1.1")});
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi(), classPath("KESTA_BlueLight"),
                                                       Texts{"ElementName", "Caption"});

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(names(outcome.instances()[0]),
            (Texts{"CreationClassName", "DeviceID", "SystemCreationClassName", "SystemName",
                   "Caption", "ElementName"}));
  EXPECT_EQ(providerLog(),
            (Texts{entering("BlueLight_EnumInstances", kFile, kEnumListWithProperties),
                   exiting("BlueLight_EnumInstances", kFile, kEnumListWithProperties)}));
}

TEST_F(LightProviderTest, EnumInstancesComparesPropertyNamesCaseSensitively) {
  useTree({blueLight("1.1")});
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi(), classPath("KESTA_BlueLight"),
                                                       Texts{"elementname"});

  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(names(outcome.instances()[0]), kKeys);
  // Not set at all, rather than set and dropped by the broker's filter.
  EXPECT_EQ(callsOf(outcome, "setProperty").size(), 4u);
}

TEST_F(LightProviderTest, EnumInstancesWithAnEmptyPropertyListSetsTheKeysOnly) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  broker_.resetCreationCounts();
  const Outcome outcome =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"), Texts{});

  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(names(outcome.instances()[0]), kKeys);
  EXPECT_EQ(broker_.creationCounts()[CreatingFunction::NewArray], 0u);
}

TEST_F(LightProviderTest, EnumInstancesWithOperationalStatusListed) {
  useTree({blueLight("1.1", 20u)});
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi(), classPath("KESTA_BlueLight"),
                                                       Texts{"OperationalStatus"});

  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]),
            (Texts{"CreationClassName = \"KESTA_BlueLight\"", "DeviceID = \"Blue Light:1.1\"",
                   "SystemCreationClassName = \"KESTA_ComputerSystem\"",
                   "SystemName = \"bbhost.example\"", "OperationalStatus = {3, 5}"}));
}

TEST_F(LightProviderTest, EnumInstancesArrayFailureHandsOverThePartlyBuiltInstance) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  const Outcome outcome =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kArrayStatusText));
  EXPECT_EQ(traces(outcome), (Texts{kArrayTraceText}));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance Valid", "Done Valid"}));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(names(outcome.instances()[0]), take(kAllNames, 10));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_EnumInstances", kFile, kEnumList),
                                  exiting("BlueLight_EnumInstances", kFile, kEnumList)}));
  // The builder leaves out its exit line after the array failure.
  EXPECT_EQ(factoryLog(), (Texts{entering("getAllBlueLightCMPIInstances", kFactoryFile, kAllList),
                                 entering("makeBlueLightInstance", kFactoryFile, kMakeList),
                                 exiting("getAllBlueLightCMPIInstances", kFactoryFile, kAllList)}));
}

TEST_F(LightProviderTest, EnumInstancesArrayFailureWithTheBrokersStatusGetsTheModulesText) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewArray, 1,
                                      StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "denied")));
  const Outcome outcome =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kArrayStatusText));
  EXPECT_EQ(traces(outcome), (Texts{kArrayTraceText}));
}

TEST_F(LightProviderTest, EnumInstancesArrayFailureOfTheLastLightSurfaces) {
  useTwoLights();
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 2));
  const Outcome outcome =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kArrayStatusText));
  ASSERT_EQ(outcome.instances().size(), 2u);
  EXPECT_EQ(names(outcome.instances()[0]), kAllNames);
  EXPECT_EQ(names(outcome.instances()[1]), take(kAllNames, 10));
}

TEST_F(LightProviderTest, EnumInstancesArrayFailureOfAnEarlierLightIsOverwrittenByLaterCalls) {
  // One status serves every broker call, so the next light's successful calls reset it.
  useTwoLights();
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  const Outcome outcome =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(traces(outcome), (Texts{kArrayTraceText}));
  ASSERT_EQ(outcome.instances().size(), 2u);
  EXPECT_EQ(names(outcome.instances()[0]), take(kAllNames, 10));
  EXPECT_EQ(names(outcome.instances()[1]), kAllNames);
}

TEST_F(LightProviderTest, EnumInstancesHandsOverNullWhenThePathCannotBeMade) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
  const Outcome outcome =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullPointer", "Done Valid"}));
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(factoryLog(), (Texts{entering("getAllBlueLightCMPIInstances", kFactoryFile, kAllList),
                                 entering("makeBlueLightInstance", kFactoryFile, kMakeList),
                                 exiting("makeBlueLightInstance", kFactoryFile, kMakeList),
                                 exiting("getAllBlueLightCMPIInstances", kFactoryFile, kAllList)}));
}

TEST_F(LightProviderTest, EnumInstancesPassesNoStatusToThePathOrInstanceCreation) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  const StatusValue denied(CMPI_RC_ERR_ACCESS_DENIED, "denied");
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewObjectPath, 1, denied));
  const Outcome noPath =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"));
  EXPECT_EQ(noPath.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(noPath), (Texts{"Instance NullPointer", "Done Valid"}));

  broker_.clearFaults();
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewInstance, 1, denied));
  const Outcome noInstance =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"));
  EXPECT_EQ(noInstance.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(noInstance), (Texts{"Instance NullPointer", "Done Valid"}));
}

TEST_F(LightProviderTest, EnumInstancesHandsOverNullForAnInstanceWithoutHandle) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewInstance, 1));
  const Outcome outcome =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullPointer", "Done Valid"}));
}

TEST_F(LightProviderTest, EnumInstancesKeepsTheOtherLightsWhenOneInstanceCannotBeMade) {
  useTwoLights();
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 2));
  const Outcome outcome =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome),
            (Texts{"Instance Valid", "Instance NullPointer", "Done Valid"}));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(*outcome.instances()[0].find("DeviceID"), Value("Blue Light:1.1"));
}

// ---- GetInstance ----------------------------------------------------------------------------

TEST_F(LightProviderTest, GetInstanceOfAKnownDeviceIDReturnsThatLight) {
  useTree({blueLight("1.1", 1u, 2u), blueLight("1.2", 20u, 3u)});
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), lightPath("Blue Light:1.2"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance Valid", "Done Valid"}));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]),
            lightProperties("Blue Light:1.2", "10", "{3, 5}", "3"));
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_GetInstance", kFile, kGetList),
                                  exiting("BlueLight_GetInstance", kFile, kGetList)}));
  EXPECT_EQ(factoryLog(), (Texts{entering("getOneBlueLightCMPIInstance", kFactoryFile, kOneList),
                                 entering("makeBlueLightInstance", kFactoryFile, kMakeList),
                                 exiting("makeBlueLightInstance", kFactoryFile, kMakeList),
                                 exiting("getOneBlueLightCMPIInstance", kFactoryFile, kOneList)}));
}

TEST_F(LightProviderTest, GetInstanceWithADeviceIDDoesNotCompareTheOtherKeys) {
  useTree({blueLight("1.1")});
  ObjectPathValue cop = lightPath("Blue Light:1.1", "other/ns");
  cop.addKey("CreationClassName", Value("Something_Else"));
  cop.addKey("SystemName", Value("another.host"));
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), cop);

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(*outcome.instances()[0].find("SystemName"), Value(kSystemName));
  EXPECT_EQ(*outcome.instances()[0].find("CreationClassName"), Value("KESTA_BlueLight"));
}

TEST_F(LightProviderTest, GetInstanceOfAnUnknownDeviceIDReturnsOkWithNothingAndNoDone) {
  useTwoLights();
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), lightPath("Blue Light:9.9"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_GetInstance", kFile, kGetList)}));
  EXPECT_EQ(factoryLog(), (Texts{entering("getOneBlueLightCMPIInstance", kFactoryFile, kOneList)}));
}

TEST_F(LightProviderTest, GetInstanceFindsAPaddedLightByItsStrippedDeviceIDOnly) {
  useTree({blueLight("1.1", 1u, 2u, "  Blue Light")});
  const Outcome unstripped = cmpihost::getInstance(broker_, mi(), lightPath("  Blue Light:1.1"));
  EXPECT_EQ(unstripped.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(unstripped.results.empty());

  const Outcome stripped = cmpihost::getInstance(broker_, mi(), lightPath("Blue Light:1.1"));
  EXPECT_EQ(handOverKinds(stripped), (Texts{"Instance Valid", "Done Valid"}));
}

TEST_F(LightProviderTest, GetInstanceWithoutKeysFailsWithoutReadingTheInstrumentation) {
  useTwoLights();
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("At least one key should be passed")));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_EQ(traces(outcome),
            (Texts{"2 BlueLightProfileProvider: At least one key should be passed"}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_GetInstance", kFile, kGetList),
                                  exiting("BlueLight_GetInstance", kFile, kGetList)}));
  EXPECT_TRUE(log(kFactoryCategory).empty());
  EXPECT_TRUE(log(kCollectorCategory).empty());
}

TEST_F(LightProviderTest, GetInstanceWithoutKeysHasNoMessageWhenTheStringCannotBeMade) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewString, 1));
  const Outcome outcome = cmpihost::getInstance(broker_, instanceMi, classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_EQ(traces(outcome),
            (Texts{"2 BlueLightProfileProvider: At least one key should be passed"}));
}

TEST_F(LightProviderTest, GetInstanceWithKeysButNoDeviceIDComparesWholePathsAndFindsNothing) {
  useTwoLights();
  ObjectPathValue cop = lightPath("Blue Light:1.1");
  cop.removeKey("DeviceID");
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), cop);

  // The later calls of the walk leave CMPI_RC_OK behind.
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_GetInstance", kFile, kGetList),
                                  exiting("BlueLight_GetInstance", kFile, kGetList)}));
  const Texts factory = factoryLog();
  ASSERT_FALSE(factory.empty());
  EXPECT_EQ(factory.front(), entering("getAllBlueLightCMPIInstances", kFactoryFile,
                                      " broker=PTR ref=PTR properties=0 isObjPath=0 "
                                      "instances=PTRrc=PTR"));
  EXPECT_EQ(factory.back(), exiting("getAllBlueLightCMPIInstances", kFactoryFile, kAllList));
}

TEST_F(LightProviderTest, GetInstanceWithoutDeviceIDAndWithoutLightsKeepsTheStatusOfGetKey) {
  // Nothing is called after the failed key lookup, so its status is the one returned.
  ObjectPathValue cop = lightPath("Blue Light:1.1");
  cop.removeKey("DeviceID");
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), cop);

  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_NOT_FOUND,
                        std::string("CMPIObjectPathFT.getKey: no key named DeviceID")));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_GetInstance", kFile, kGetList),
                                  exiting("BlueLight_GetInstance", kFile, kGetList)}));
}

TEST_F(LightProviderTest, GetInstanceTreatsADeviceIDOfAnotherTypeAsMissing) {
  useTwoLights();
  ObjectPathValue cop = lightPath("Blue Light:1.1");
  cop.addKey("DeviceID", Value::uint16(11));
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), cop);

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  const Texts factory = factoryLog();
  ASSERT_FALSE(factory.empty());
  EXPECT_EQ(factory.front(), entering("getAllBlueLightCMPIInstances", kFactoryFile, kAllList));
}

TEST_F(LightProviderTest, GetInstanceTreatsANullDeviceIDAsMissing) {
  useTwoLights();
  ObjectPathValue cop = lightPath("Blue Light:1.1");
  cop.addKey("DeviceID", Value::null(CMPI_string));
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), cop);

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  const Texts factory = factoryLog();
  ASSERT_FALSE(factory.empty());
  EXPECT_EQ(factory.front(), entering("getAllBlueLightCMPIInstances", kFactoryFile, kAllList));
}

TEST_F(LightProviderTest, GetInstanceWithoutUsableDeviceIDReturnsTheLightWhosePathEqualsCop) {
  // An object manager that looks key names up exactly does not find "DeviceID" under the name
  // "deviceid"; the whole-path comparison, which ignores the case of names, still finds the light.
  useTree({blueLight("1.1"), blueLight("1.2"), blueLight("1.3")});
  ObjectPathValue cop("root/cimv2", "KESTA_BlueLight");
  cop.addKey("CreationClassName", Value("KESTA_BlueLight"));
  cop.addKey("deviceid", Value("Blue Light:1.2"));
  cop.addKey("SystemCreationClassName", Value("KESTA_ComputerSystem"));
  cop.addKey("SystemName", Value(kSystemName));
  const Outcome outcome = getWithExactKeyLookup(cop);

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance Valid", "Done Valid"}));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]),
            lightProperties("Blue Light:1.2", "5", "{2, 11}", "2"));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_GetInstance", kFile, kGetList),
                                  exiting("BlueLight_GetInstance", kFile, kGetList)}));
}

TEST_F(LightProviderTest, GetInstanceWithoutUsableDeviceIDSkipsLightsWithoutInstance) {
  useTwoLights();
  CMPIInstanceMI* instanceMi = mi();
  ObjectPathValue cop("root/cimv2", "KESTA_BlueLight");
  cop.addKey("CreationClassName", Value("KESTA_BlueLight"));
  cop.addKey("deviceid", Value("Blue Light:1.1"));
  cop.addKey("SystemCreationClassName", Value("KESTA_ComputerSystem"));
  cop.addKey("SystemName", Value(kSystemName));
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
    ExactKeyPath path(request.objectPath(cop));
    return instanceMi->ft->getInstance(instanceMi, request.context(), request.result(), path.cmpi(),
                                       nullptr);
  });

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
}

TEST_F(LightProviderTest, GetInstanceWithoutDeviceIDReturnsTheStatusOfTheLastPathLookup) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  ObjectPathValue cop = lightPath("Blue Light:1.1");
  cop.removeKey("DeviceID");
  broker_.armFault(Fault::errorStatus(CreatingFunction::GetObjectPath, 1,
                                      StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "no path")));
  const Outcome outcome = cmpihost::getInstance(broker_, instanceMi, cop);

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_ACCESS_DENIED, std::string("no path")));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
}

TEST_F(LightProviderTest, GetInstanceSetsOnlyTheKeysAndTheListedProperties) {
  useTree({blueLight("1.1", 20u)});
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), lightPath("Blue Light:1.1"),
                                                Texts{"HealthState", "healthstate"});

  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]),
            (Texts{"CreationClassName = \"KESTA_BlueLight\"", "DeviceID = \"Blue Light:1.1\"",
                   "SystemCreationClassName = \"KESTA_ComputerSystem\"",
                   "SystemName = \"bbhost.example\"", "HealthState = 10"}));
  const std::string list = " mi=PTR ctx=PTR result=PTR cop=PTR properties=PTR";
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_GetInstance", kFile, list),
                                  exiting("BlueLight_GetInstance", kFile, list)}));
}

TEST_F(LightProviderTest, GetInstanceHandsOverNullWhenTheInstanceCannotBeMade) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome outcome = cmpihost::getInstance(broker_, instanceMi, lightPath("Blue Light:1.1"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullPointer", "Done Valid"}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLight_GetInstance", kFile, kGetList),
                                  exiting("BlueLight_GetInstance", kFile, kGetList)}));
}

TEST_F(LightProviderTest, GetInstanceArrayFailureReturnsThePartlyBuiltInstance) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  const Outcome outcome = cmpihost::getInstance(broker_, instanceMi, lightPath("Blue Light:1.1"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kArrayStatusText));
  EXPECT_EQ(traces(outcome), (Texts{kArrayTraceText}));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(names(outcome.instances()[0]), take(kAllNames, 10));
  EXPECT_EQ(outcome.doneCount, 1u);
}

TEST_F(LightProviderTest, EveryOperationReadsTheTreeAfresh) {
  CMPIInstanceMI* instanceMi = mi();
  useTree({blueLight("1.1")});
  EXPECT_EQ(cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath("KESTA_BlueLight"))
                .paths()
                .size(),
            1u);
  useTree({blueLight("1.1"), blueLight("1.2")});
  EXPECT_EQ(cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath("KESTA_BlueLight"))
                .paths()
                .size(),
            2u);
}

}  // namespace
}  // namespace blackbox
