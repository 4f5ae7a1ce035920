// The KESTA_BlueLightCapabilities instance provider through the loaded library:
// EnumerateInstanceNames, EnumerateInstances and GetInstance of the one capabilities record,
// checked through what the host records and through the provider's log.
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
using cmpihost::ObjectPathValue;
using cmpihost::Outcome;
using cmpihost::StatusValue;
using cmpihost::Value;
using testsupport::blueLight;
using Texts = std::vector<std::string>;

const std::string kClass = "KESTA_BlueLightCapabilities";
const std::string kInstanceID = "KESTA:BlueLightCapabilities1";
const std::string kProviderCategory = "Varnel.BlueLightCapabilitiesProvider";
const std::string kFactoryCategory = "Varnel.BlueLightObjFactory";
const std::string kCollectorCategory = "Varnel.BlueLight";
const std::string kFile = "BlueLightCapabilitiesProvider.cpp";
const std::string kFactoryFile = "BlueLightObjFactory.cpp";

const std::string kNamesList = " mi=PTR ctx=PTR result=PTR ref=PTR";
const std::string kEnumList = " mi=PTR ctx=PTR result=PTR ref=PTR properties=0";
const std::string kGetList = " mi=PTR ctx=PTR result=PTR cop=PTR properties=0";

const std::string kPathsList = " broker=PTR ref=PTR objectPaths=PTR status=PTR";
const std::string kAllList = " broker=PTR ref=PTR properties=0 isObjPath=0 instances=PTR rc=PTR";
const std::string kOneList = " broker=PTR ref=PTR key=PTR properties=0 instances=PTR rc=PTR";
// This builder spells its flag with a capital I.
const std::string kMakeList =
    " broker=PTR ref=PTR bluelightCap=PTR properties=0 IsObjPath=0 rc=PTR";
const std::string kCollectList = " vectBlueLight=PTR instrumentation=PTR";

const Texts kFullRecord = {"InstanceID = \"KESTA:BlueLightCapabilities1\"",
                           "RequestedAlarmStatesSupported = {1, 2, 3}"};
const Texts kKeyOnly = {"InstanceID = \"KESTA:BlueLightCapabilities1\""};

const std::string kArrayStatusText =
    "Creating array for Property                         RequestedAlarmStatesSupported failed.";
const std::string kArrayTraceText =
    "2 BlueLightCapabilitiesProvider: Creating Array for Property                         "
    "RequestedAlarmStatesSupported failed.";
const std::string kPathTraceText =
    "2 BlueLightCapabilitiesProvider: Create CMPIObjectPath failed for                     "
    "BlueLightCapabilities class";

class CapabilitiesProviderTest : public BlackboxTest {
 protected:
  CMPIInstanceMI* mi() { return instanceMI(kCapabilitiesProvider); }

  // The provider's own lines, which must reach the log level and the trace level alike.
  Texts providerLog() const {
    Texts logged = logAtBothLevels(kProviderCategory);
    for (const testsupport::LogLine& line : logLines()) {
      EXPECT_EQ(line.level, 3000) << line;
    }
    return logged;
  }
  Texts factoryLog() const { return logAtBothLevels(kFactoryCategory); }

  static ObjectPathValue pathWithKey(const std::string& name, const Value& value) {
    ObjectPathValue path(kNameSpace, kClass);
    path.addKey(name, value);
    return path;
  }
};

// ---- EnumerateInstanceNames -----------------------------------------------------------------

TEST_F(CapabilitiesProviderTest, EnumInstanceNamesReturnsTheOneRecordsPath) {
  useTree({blueLight("1.1"), blueLight("1.2")});
  const Outcome outcome = cmpihost::enumerateInstanceNames(broker_, mi(), classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"ObjectPath Valid", "Done Valid"}));
  ASSERT_EQ(outcome.paths().size(), 1u);
  EXPECT_EQ(outcome.paths()[0].toString(),
            "//bbhost.example/root/cimv2:KESTA_BlueLightCapabilities.InstanceID=\"KESTA:"
            "BlueLightCapabilities1\"");
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(),
            (Texts{entering("BlueLightCapabilities_EnumInstanceNames", kFile, kNamesList),
                   exiting("BlueLightCapabilities_EnumInstanceNames", kFile, kNamesList)}));
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getAllBlueLightCapabilitiesCMPIObjPaths", kFactoryFile, kPathsList),
                   exiting("getAllBlueLightCapabilitiesCMPIObjPaths", kFactoryFile, kPathsList)}));
  // The lights are not read for the capabilities.
  EXPECT_TRUE(log(kCollectorCategory).empty());
}

TEST_F(CapabilitiesProviderTest, EnumInstanceNamesSetsTheNamespaceOfRefBeforeHandingOver) {
  const Outcome outcome =
      cmpihost::enumerateInstanceNames(broker_, mi(), classPath(kClass, "interop/lights"));

  ASSERT_EQ(outcome.paths().size(), 1u);
  EXPECT_EQ(outcome.paths()[0].nameSpace(), "interop/lights");
  Texts sequence;
  for (const cmpihost::CallRecord& call : outcome.calls) {
    if (call.function == "setNameSpace" || call.function == "returnObjectPath" ||
        call.function == "returnDone") {
      sequence.push_back(call.function);
    }
  }
  EXPECT_EQ(sequence, (Texts{"setNameSpace", "setNameSpace", "returnObjectPath", "returnDone"}));
}

TEST_F(CapabilitiesProviderTest, EnumInstanceNamesFailsWhenThePathCannotBeMade) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
  const Outcome outcome = cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath(kClass));

  // No full stop at the end of this provider's text.
  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("Create CMPIObjectPath failed")));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (Texts{kPathTraceText}));
  EXPECT_EQ(providerLog(),
            (Texts{entering("BlueLightCapabilities_EnumInstanceNames", kFile, kNamesList)}));
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getAllBlueLightCapabilitiesCMPIObjPaths", kFactoryFile, kPathsList)}));
}

TEST_F(CapabilitiesProviderTest, EnumInstanceNamesFailsOnAPathWithoutHandle) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewObjectPath, 1));
  const Outcome outcome = cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("Create CMPIObjectPath failed")));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (Texts{kPathTraceText}));
}

TEST_F(CapabilitiesProviderTest, EnumInstanceNamesSkipsAPathThatLostItsHandleSilently) {
  CMPIInstanceMI* instanceMi = mi();
  // The path loses its handle when its key is added, before the hand-over looks at it.
  broker_.armFault(Fault::invalidateHandle(cmpihost::ObjectFunction::pathAddKey(), 1));
  const Outcome outcome = cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(),
            (Texts{entering("BlueLightCapabilities_EnumInstanceNames", kFile, kNamesList),
                   exiting("BlueLightCapabilities_EnumInstanceNames", kFile, kNamesList)}));
}

TEST_F(CapabilitiesProviderTest, EnumInstanceNamesHandsOverAPathThatLosesItsHandleLate) {
  CMPIInstanceMI* instanceMi = mi();
  // The second setNameSpace is the hand-over's, after the handle test.
  broker_.armFault(Fault::invalidateHandle(cmpihost::ObjectFunction::pathSetNameSpace(), 2));
  const Outcome outcome = cmpihost::enumerateInstanceNames(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"ObjectPath NullHandle", "Done Valid"}));
}

// ---- EnumerateInstances ---------------------------------------------------------------------

TEST_F(CapabilitiesProviderTest, EnumInstancesReturnsTheRecordWithItsAlarmStates) {
  useTree({blueLight("1.1")});
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi(), classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance Valid", "Done Valid"}));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]), kFullRecord);
  EXPECT_EQ(outcome.instances()[0].path().className(), kClass);
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(),
            (Texts{entering("BlueLightCapabilities_EnumInstances", kFile, kEnumList),
                   exiting("BlueLightCapabilities_EnumInstances", kFile, kEnumList)}));
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getAllBlueLightCapabilitiesCMPIInstances", kFactoryFile, kAllList),
                   entering("makeBlueLightCapabilitiesInstance", kFactoryFile, kMakeList),
                   exiting("makeBlueLightCapabilitiesInstance", kFactoryFile, kMakeList),
                   exiting("getAllBlueLightCapabilitiesCMPIInstances", kFactoryFile, kAllList)}));
  EXPECT_TRUE(log(kCollectorCategory).empty());
}

TEST_F(CapabilitiesProviderTest, EnumInstancesIsTheSameWithoutAnyLight) {
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi(), classPath(kClass));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]), kFullRecord);
  // Asked twice, the alarm states do not grow.
  const Outcome again = cmpihost::enumerateInstances(broker_, mi(), classPath(kClass));
  ASSERT_EQ(again.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(again.instances()[0]), kFullRecord);
}

TEST_F(CapabilitiesProviderTest, EnumInstancesWithTheArrayListedSetsBothProperties) {
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi(), classPath(kClass),
                                                       Texts{"RequestedAlarmStatesSupported"});
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]), kFullRecord);
  const std::string list = " mi=PTR ctx=PTR result=PTR ref=PTR properties=PTR";
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLightCapabilities_EnumInstances", kFile, list),
                                  exiting("BlueLightCapabilities_EnumInstances", kFile, list)}));
}

TEST_F(CapabilitiesProviderTest, EnumInstancesWithAListWithoutTheArraySetsTheKeyOnly) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.resetCreationCounts();
  const Outcome outcome =
      cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass), Texts{"ElementName"});
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]), kKeyOnly);
  EXPECT_EQ(broker_.creationCounts()[CreatingFunction::NewArray], 0u);
}

TEST_F(CapabilitiesProviderTest, EnumInstancesWithAnEmptyListSetsTheKeyOnly) {
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi(), classPath(kClass), Texts{});
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]), kKeyOnly);
}

TEST_F(CapabilitiesProviderTest, EnumInstancesComparesPropertyNamesCaseSensitively) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.resetCreationCounts();
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass),
                                                       Texts{"requestedalarmstatessupported"});
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]), kKeyOnly);
  // Not set at all, rather than set and dropped by the broker's filter.
  EXPECT_EQ(broker_.creationCounts()[CreatingFunction::NewArray], 0u);
}

TEST_F(CapabilitiesProviderTest, EnumInstancesArrayFailureReturnsTheKeyOnlyInstance) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass));

  // "array" in the status, "Array" in the trace.
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kArrayStatusText));
  EXPECT_EQ(traces(outcome), (Texts{kArrayTraceText}));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance Valid", "Done Valid"}));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]), kKeyOnly);
  EXPECT_EQ(providerLog(),
            (Texts{entering("BlueLightCapabilities_EnumInstances", kFile, kEnumList),
                   exiting("BlueLightCapabilities_EnumInstances", kFile, kEnumList)}));
  // Unlike the light builder, this one still writes its exit line.
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getAllBlueLightCapabilitiesCMPIInstances", kFactoryFile, kAllList),
                   entering("makeBlueLightCapabilitiesInstance", kFactoryFile, kMakeList),
                   exiting("makeBlueLightCapabilitiesInstance", kFactoryFile, kMakeList),
                   exiting("getAllBlueLightCapabilitiesCMPIInstances", kFactoryFile, kAllList)}));
}

TEST_F(CapabilitiesProviderTest, EnumInstancesArrayFailureWithTheBrokersStatusGetsTheModulesText) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewArray, 1,
                                      StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "denied")));
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kArrayStatusText));
  EXPECT_EQ(traces(outcome), (Texts{kArrayTraceText}));
}

TEST_F(CapabilitiesProviderTest, EnumInstancesArrayFailureWithoutAMessageString) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  broker_.armFault(Fault::nullResult(CreatingFunction::NewString, 1));
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED));
  EXPECT_EQ(traces(outcome), (Texts{kArrayTraceText}));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance Valid", "Done Valid"}));
}

TEST_F(CapabilitiesProviderTest, EnumInstancesHandsOverNullWhenThePathCannotBeMade) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullPointer", "Done Valid"}));
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(),
            (Texts{entering("BlueLightCapabilities_EnumInstances", kFile, kEnumList),
                   exiting("BlueLightCapabilities_EnumInstances", kFile, kEnumList)}));
}

TEST_F(CapabilitiesProviderTest, EnumInstancesReturnsTheBrokersStatusOfAFailedPath) {
  // The operation's status is the rc of the path creation, and nothing after it resets it.
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewObjectPath, 1,
                                      StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "denied")));
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_ACCESS_DENIED, std::string("denied")));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullPointer", "Done Valid"}));
}

TEST_F(CapabilitiesProviderTest, EnumInstancesHandsOverNullWhenTheInstanceCannotBeMade) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullPointer", "Done Valid"}));
}

TEST_F(CapabilitiesProviderTest, EnumInstancesPassesNoStatusToTheInstanceCreation) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewInstance, 1,
                                      StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "denied")));
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullPointer", "Done Valid"}));
}

TEST_F(CapabilitiesProviderTest, EnumInstancesHandsOverAnInstanceWithoutHandleAsItIs) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewInstance, 1));
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullHandle", "Done Valid"}));
  // Nothing was set on it.
  for (const cmpihost::CallRecord& call : outcome.calls) {
    EXPECT_NE(call.function, "setProperty") << call;
    EXPECT_NE(call.function, "setPropertyFilter") << call;
  }
}

// ---- GetInstance ----------------------------------------------------------------------------

TEST_F(CapabilitiesProviderTest, GetInstanceOfTheRecordReturnsIt) {
  useTree({blueLight("1.1")});
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), capabilitiesPath());

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance Valid", "Done Valid"}));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]), kFullRecord);
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLightCapabilities_GetInstance", kFile, kGetList),
                                  exiting("BlueLightCapabilities_GetInstance", kFile, kGetList)}));
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getOneBlueLightCapabilitiesCMPIInstance", kFactoryFile, kOneList),
                   entering("makeBlueLightCapabilitiesInstance", kFactoryFile, kMakeList),
                   exiting("makeBlueLightCapabilitiesInstance", kFactoryFile, kMakeList),
                   exiting("getOneBlueLightCapabilitiesCMPIInstance", kFactoryFile, kOneList)}));
  // The keyed lookup collects the capabilities only.
  EXPECT_TRUE(log(kCollectorCategory).empty());
}

TEST_F(CapabilitiesProviderTest, GetInstanceOfAnyOtherInstanceIDReturnsOkWithNothingAndNoDone) {
  for (const std::string& id :
       {std::string("kesta:bluelightcapabilities1"), std::string("KESTA:BlueLightCapabilities1 "),
        std::string(" KESTA:BlueLightCapabilities1"), std::string("KESTA:BlueLightCapabilities2"),
        std::string()}) {
    SCOPED_TRACE("InstanceID \"" + id + "\"");
    const Outcome outcome =
        cmpihost::getInstance(broker_, mi(), pathWithKey("InstanceID", Value(id)));

    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(outcome.status.message, std::nullopt);
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(outcome.doneCount, 0u);
    EXPECT_TRUE(traces(outcome).empty());
    EXPECT_EQ(providerLog(),
              (Texts{entering("BlueLightCapabilities_GetInstance", kFile, kGetList)}));
    EXPECT_EQ(factoryLog(),
              (Texts{entering("getOneBlueLightCapabilitiesCMPIInstance", kFactoryFile, kOneList)}));
    clearLog();
  }
}

TEST_F(CapabilitiesProviderTest, GetInstanceWithoutKeysFails) {
  const Outcome outcome = cmpihost::getInstance(broker_, mi(), classPath(kClass));

  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("At least one key should be passed")));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_EQ(traces(outcome),
            (Texts{"2 BlueLightCapabilitiesProvider: At least one key should be passed"}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLightCapabilities_GetInstance", kFile, kGetList),
                                  exiting("BlueLightCapabilities_GetInstance", kFile, kGetList)}));
  // No factory is built.
  EXPECT_TRUE(log(kFactoryCategory).empty());
  EXPECT_TRUE(log(kCollectorCategory).empty());
}

TEST_F(CapabilitiesProviderTest, GetInstanceWithoutKeysHasNoMessageWhenTheStringCannotBeMade) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewString, 1));
  const Outcome outcome = cmpihost::getInstance(broker_, instanceMi, classPath(kClass));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_EQ(traces(outcome),
            (Texts{"2 BlueLightCapabilitiesProvider: At least one key should be passed"}));
}

TEST_F(CapabilitiesProviderTest, GetInstanceWithoutInstanceIDCollectsTheLightsAndFindsNothing) {
  useTree({blueLight("1.1"), blueLight("1.2")});
  const Outcome outcome =
      cmpihost::getInstance(broker_, mi(), pathWithKey("Name", Value("anything")));

  // Nothing is called after the failed key lookup, so its status is the one returned.
  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_NOT_FOUND,
                        std::string("CMPIObjectPathFT.getKey: no key named InstanceID")));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLightCapabilities_GetInstance", kFile, kGetList),
                                  exiting("BlueLightCapabilities_GetInstance", kFile, kGetList)}));
  // The fallback's factory reads the lights, not the capabilities: its capabilities are empty.
  EXPECT_EQ(log(kCollectorCategory), (Texts{entering("setVector", "BlueLight.cpp", kCollectList),
                                            exiting("setVector", "BlueLight.cpp", kCollectList)}));
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getAllBlueLightCapabilitiesCMPIInstances", kFactoryFile, kAllList),
                   exiting("getAllBlueLightCapabilitiesCMPIInstances", kFactoryFile, kAllList)}));
}

TEST_F(CapabilitiesProviderTest, GetInstanceTreatsAnInstanceIDOfAnotherTypeAsMissing) {
  const Outcome outcome =
      cmpihost::getInstance(broker_, mi(), pathWithKey("InstanceID", Value::uint16(1)));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_EQ(log(kCollectorCategory).size(), 2u);
  EXPECT_EQ(factoryLog(),
            (Texts{entering("getAllBlueLightCapabilitiesCMPIInstances", kFactoryFile, kAllList),
                   exiting("getAllBlueLightCapabilitiesCMPIInstances", kFactoryFile, kAllList)}));
}

TEST_F(CapabilitiesProviderTest, GetInstanceTreatsANullInstanceIDAsMissing) {
  const Outcome outcome =
      cmpihost::getInstance(broker_, mi(), pathWithKey("InstanceID", Value::null(CMPI_string)));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_EQ(factoryLog().front(),
            entering("getAllBlueLightCapabilitiesCMPIInstances", kFactoryFile, kAllList));
}

TEST_F(CapabilitiesProviderTest, GetInstanceFallbackFindsNothingEvenForTheRecordsOwnPath) {
  // An object manager that looks key names up exactly does not find "InstanceID" under the name
  // "instanceid"; the path names the record all the same, but the fallback has no record to
  // compare it with.
  CMPIInstanceMI* instanceMi = mi();
  const ObjectPathValue cop = pathWithKey("instanceid", Value(kInstanceID));
  const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
    ExactKeyPath path(request.objectPath(cop));
    return instanceMi->ft->getInstance(instanceMi, request.context(), request.result(), path.cmpi(),
                                       nullptr);
  });

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_NOT_FOUND));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLightCapabilities_GetInstance", kFile, kGetList),
                                  exiting("BlueLightCapabilities_GetInstance", kFile, kGetList)}));
}

TEST_F(CapabilitiesProviderTest, GetInstanceWithAListWithoutTheArraySetsTheKeyOnly) {
  const Outcome withOther =
      cmpihost::getInstance(broker_, mi(), capabilitiesPath(), Texts{"ElementName"});
  ASSERT_EQ(withOther.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(withOther.instances()[0]), kKeyOnly);

  const Outcome empty = cmpihost::getInstance(broker_, mi(), capabilitiesPath(), Texts{});
  ASSERT_EQ(empty.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(empty.instances()[0]), kKeyOnly);

  const Outcome listed = cmpihost::getInstance(broker_, mi(), capabilitiesPath(),
                                               Texts{"RequestedAlarmStatesSupported"});
  ASSERT_EQ(listed.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(listed.instances()[0]), kFullRecord);
}

TEST_F(CapabilitiesProviderTest, GetInstanceHandsOverNullWhenTheInstanceCannotBeMade) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome outcome = cmpihost::getInstance(broker_, instanceMi, capabilitiesPath());

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullPointer", "Done Valid"}));
  EXPECT_EQ(providerLog(), (Texts{entering("BlueLightCapabilities_GetInstance", kFile, kGetList),
                                  exiting("BlueLightCapabilities_GetInstance", kFile, kGetList)}));
}

TEST_F(CapabilitiesProviderTest, GetInstanceHandsOverAnInstanceWithoutHandleAsItIs) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewInstance, 1));
  const Outcome outcome = cmpihost::getInstance(broker_, instanceMi, capabilitiesPath());

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance NullHandle", "Done Valid"}));
}

TEST_F(CapabilitiesProviderTest, GetInstanceArrayFailureReturnsTheKeyOnlyInstance) {
  CMPIInstanceMI* instanceMi = mi();
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  const Outcome outcome = cmpihost::getInstance(broker_, instanceMi, capabilitiesPath());

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kArrayStatusText));
  EXPECT_EQ(traces(outcome), (Texts{kArrayTraceText}));
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Instance Valid", "Done Valid"}));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(outcome.instances()[0]), kKeyOnly);
}

TEST_F(CapabilitiesProviderTest, TheRecordIsServedWhenTheLightsCannotBeRead) {
  testsupport::ScopedEnv broken("KESTA_INSTRUMENTATION", "file:" + dir_.file("missing.json"));
  const Outcome names = cmpihost::enumerateInstanceNames(broker_, mi(), classPath(kClass));
  EXPECT_EQ(names.paths().size(), 1u);
  const Outcome got = cmpihost::getInstance(broker_, mi(), capabilitiesPath());
  ASSERT_EQ(got.instances().size(), 1u);
  EXPECT_EQ(propertyTexts(got.instances()[0]), kFullRecord);
}

}  // namespace
}  // namespace blackbox
