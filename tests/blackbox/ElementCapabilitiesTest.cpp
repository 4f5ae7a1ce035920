// KESTA_BlueLightElementCapabilities, instance side, as an object manager sees it through the
// dlopen-loaded library: EnumInstanceNames, EnumInstances, GetInstance, and every way the
// association builder and the name enumeration can fail (made to happen by broker faults).
#include <algorithm>
#include <string>
#include <vector>

#include "BlackboxFixture.h"

namespace {

using blackbox::entering;
using blackbox::exiting;
using blackbox::kElementCapabilitiesProvider;
using blackbox::kNameSpace;
using blackbox::kSystemName;
using cmpihost::CallRecord;
using cmpihost::CreatingFunction;
using cmpihost::Fault;
using cmpihost::InstanceValue;
using cmpihost::ObjectFunction;
using cmpihost::ObjectPathValue;
using cmpihost::ObjectState;
using cmpihost::Outcome;
using cmpihost::ResultKind;
using cmpihost::StatusValue;
using cmpihost::Value;
using testsupport::blueLight;

const std::string kCategory = "Varnel.BlueLightElementCapabilitiesProvider";
const std::string kFile = "BlueLightElementCapabilitiesProvider.cpp";
const std::string kAssocClass = "KESTA_BlueLightElementCapabilities";
const std::string kComponent = "BlueLightElementCapabilitiesProvider";

const std::string kEnumNames = "BlueLightElementCapabilities_EnumInstanceNames";
const std::string kEnum = "BlueLightElementCapabilities_EnumInstances";
const std::string kGet = "BlueLightElementCapabilities_GetInstance";
const std::string kBuilder = "bluelightElementCapabilitiesCMPIInstances";

const std::string kNamesList = " mi=PTR ctx=PTR result=PTR ref=PTR";
const std::string kEnumList = " mi=PTR ctx=PTR result=PTR ref=PTR properties=0";
const std::string kEnumListWithProperties = " mi=PTR ctx=PTR result=PTR ref=PTR properties=PTR";
const std::string kGetList = " mi=PTR ctx=PTR result=PTR cop=PTR properties=0";
const std::string kBuilderList = " ref=PTR properties=0 instances=PTR";

std::string blanks(std::size_t count) { return std::string(count, ' '); }

// A broker trace as BlackboxTest::traces() writes it, from this provider at warning level.
std::string warning(const std::string& text) { return "2 " + kComponent + ": " + text; }

// The texts of the builder's and the name enumeration's failures, with their runs of blanks
// spelt out so that a lost or added blank is seen.
const std::string kBuilderNoLightPathsTrace =
    "***Can't get BlueLight ObjectPaths." + blanks(13) + "Exiting EnumerateInstanceNames***";
const std::string kBuilderLightPathNullStatus =
    "CMPIObjectPath is" + blanks(17) + "NULL for BlueLight";
const std::string kBuilderLightPathNullTrace = "CMPIObjectPath is NULL for BlueLight";
const std::string kBuilderNoCapabilitiesPathsTrace = "***Can't get ObjectPaths for" + blanks(17) +
                                                     "Capabilities" + blanks(17) +
                                                     "Exiting EnumerateInstanceNames***";
const std::string kBuilderCapabilitiesCheckStatus =
    "CMPIObjectPath is" + blanks(21) + "NULL for Capabilities";
const std::string kBuilderCapabilitiesCheckTrace = "CMPIObjectPath is NULL for Capabilities";
const std::string kBuilderAssociationPathStatus =
    "Create CMPIObjectPath failed for ElementCapabilities";
const std::string kBuilderAssociationPathTrace =
    "Create CMPIObjectPath failed for ElementCapabilities.";
const std::string kNamesLightPathNullText = "CMPIObjectPath is NULL for BlueLight class";
const std::string kNamesCapabilitiesPathNullStatus =
    "CMPIObjectPath is" + blanks(21) + "NULL for BlueLightCapabilities";
const std::string kNamesCapabilitiesPathNullTrace =
    "CMPIObjectPath is NULL for" + blanks(21) + "Capabilities";
const std::string kNamesAssociationPathStatus =
    "Create CMPIObjectPath failed" + blanks(21) + "for ElementCapabilities";
const std::string kNamesAssociationPathTrace =
    "Create CMPIObjectPath failed" + blanks(21) + "for ElementCapabilities.";

// What the factory reports when it cannot make a path (its own texts, seen here only in
// passing).
const std::string kNoLightsTrace = "1 BlueLightProfileProvider: ***No instance found***";
const std::string kLightPathFailedTrace =
    "2 BlueLightProfileProvider: Create CMPIObjectPath" + blanks(21) + "failed for RecordLogClass.";
const std::string kCapPathFailedTrace =
    "2 BlueLightCapabilitiesProvider: Create CMPIObjectPath "
    "failed for" +
    blanks(21) + "BlueLightCapabilities class";

class ElementCapabilitiesInstanceTest : public blackbox::BlackboxTest {
 protected:
  CMPIInstanceMI* mi() { return instanceMI(kElementCapabilitiesProvider); }

  Outcome enumerateNames(const std::string& nameSpace = kNameSpace) {
    return cmpihost::enumerateInstanceNames(broker_, mi(), classPath(kAssocClass, nameSpace));
  }
  Outcome enumerate(const cmpihost::PropertyList& properties = std::nullopt,
                    const std::string& nameSpace = kNameSpace) {
    return cmpihost::enumerateInstances(broker_, mi(), classPath(kAssocClass, nameSpace),
                                        properties);
  }
  Outcome get(const ObjectPathValue& path,
              const cmpihost::PropertyList& properties = std::nullopt) {
    return cmpihost::getInstance(broker_, mi(), path, properties);
  }

  // The paths as the factory makes them: in the request's namespace, with this system as host.
  static ObjectPathValue lightRef(const std::string& deviceID,
                                  const std::string& nameSpace = kNameSpace) {
    return lightPath(deviceID, nameSpace).setHost(kSystemName);
  }
  static ObjectPathValue capabilitiesRef(const std::string& nameSpace = kNameSpace) {
    return capabilitiesPath(nameSpace).setHost(kSystemName);
  }
  // The name of the association of one light, as EnumInstanceNames hands it over.
  static ObjectPathValue pairName(const std::string& deviceID,
                                  const std::string& nameSpace = kNameSpace) {
    ObjectPathValue path(nameSpace, kAssocClass);
    path.setHost(kSystemName);
    path.addKey("ManagedElement", Value(lightRef(deviceID, nameSpace)));
    path.addKey("Capabilities", Value(capabilitiesRef(nameSpace)));
    return path;
  }
  // The path a client sends to GetInstance (no host).
  static ObjectPathValue requestedPair(const std::string& deviceID,
                                       const std::string& nameSpace = kNameSpace) {
    ObjectPathValue path(nameSpace, kAssocClass);
    path.addKey("ManagedElement", Value(lightRef(deviceID, nameSpace)));
    path.addKey("Capabilities", Value(capabilitiesRef(nameSpace)));
    return path;
  }

  // Checks one association instance: its class, namespace and host, and the two references.
  static void expectPair(const InstanceValue& instance, const std::string& deviceID,
                         const std::string& nameSpace = kNameSpace) {
    EXPECT_EQ(instance.className(), kAssocClass);
    EXPECT_EQ(instance.path().nameSpace(), nameSpace);
    EXPECT_EQ(instance.path().host(), kSystemName);
    ASSERT_EQ(instance.propertyCount(), 2u) << instance;
    EXPECT_EQ(instance.properties()[0].name, "ManagedElement");
    EXPECT_EQ(instance.properties()[0].value, Value(lightRef(deviceID, nameSpace)));
    EXPECT_EQ(instance.properties()[1].name, "Capabilities");
    EXPECT_EQ(instance.properties()[1].value, Value(capabilitiesRef(nameSpace)));
  }

  // The module's lines of this provider, checked at log level and at trace level alike.
  void expectLines(const std::vector<std::string>& expected) const {
    EXPECT_EQ(log(kCategory, "LOG"), expected);
    EXPECT_EQ(log(kCategory, "TRACE"), expected);
  }

  // The lines of EnumInstances or GetInstance around a builder that fails: the builder's entry
  // line and no exit line of its own.
  void expectBuilderFailureLines(const std::string& operation, const std::string& list) const {
    expectLines({entering(operation, kFile, list), entering(kBuilder, kFile, kBuilderList),
                 exiting(operation, kFile, list)});
  }

  // The texts the operation gave to CMNewString, in order: the status messages it made.
  static std::vector<std::string> newStrings(const Outcome& outcome) {
    std::vector<std::string> texts;
    for (const CallRecord& call : outcome.calls) {
      if (call.table == "CMPIBrokerEncFT" && call.function == "newString" && !call.args.empty()) {
        texts.push_back(call.args[0]);
      }
    }
    return texts;
  }

  // The property filters the operation set, each as "(properties, keys)".
  static std::vector<std::string> filters(const Outcome& outcome) {
    std::vector<std::string> texts;
    for (const CallRecord& call : outcome.calls) {
      if (call.table == "CMPIInstanceFT" && call.function == "setPropertyFilter" &&
          call.args.size() == 3) {
        texts.push_back("(" + call.args[1] + ", " + call.args[2] + ")");
      }
    }
    return texts;
  }

  static std::size_t callCount(const Outcome& outcome, const std::string& table,
                               const std::string& function) {
    return static_cast<std::size_t>(std::count_if(
        outcome.calls.begin(), outcome.calls.end(),
        [&](const CallRecord& call) { return call.table == table && call.function == function; }));
  }
};

// ---------------------------------------------------------------------------------------------
// EnumInstanceNames
// ---------------------------------------------------------------------------------------------

TEST_F(ElementCapabilitiesInstanceTest, EnumInstanceNamesWithoutLightsEndsWithoutDoneOrExitLine) {
  const Outcome outcome = enumerateNames();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kNoLightsTrace});
  expectLines({entering(kEnumNames, kFile, kNamesList)});
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstanceNamesNamesEveryLightWithTheOneCapabilities) {
  useTree({blueLight("3"), blueLight("1"), blueLight("2")});
  const Outcome outcome = enumerateNames();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.paths(),
            (std::vector<ObjectPathValue>{pairName("Blue Light:1"), pairName("Blue Light:2"),
                                          pairName("Blue Light:3")}));
  ASSERT_EQ(outcome.results.size(), 4u);
  EXPECT_EQ(outcome.results.back().kind, ResultKind::Done);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_TRUE(traces(outcome).empty());
  expectLines({entering(kEnumNames, kFile, kNamesList), exiting(kEnumNames, kFile, kNamesList)});
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstanceNamesBuildsInTheNamespaceOfTheRequest) {
  useTree({blueLight("1")});
  const Outcome outcome = enumerateNames("root/other");
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.paths(), std::vector<ObjectPathValue>{pairName("Blue Light:1", "root/other")});
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstanceNamesLeavesTheEndPathsAsTheFactoryMadeThem) {
  useTree({blueLight("1")});
  const Outcome outcome = enumerateNames();
  // Only the association path gets its namespace set here; the two ends are not touched.
  std::vector<std::string> targets;
  for (const CallRecord& call : outcome.calls) {
    if (call.function == "setNameSpace") targets.push_back(call.args.at(0));
  }
  EXPECT_EQ(targets, (std::vector<std::string>{"root/cimv2:KESTA_BlueLight",
                                               "root/cimv2:KESTA_BlueLightCapabilities",
                                               "root/cimv2:" + kAssocClass}));
}

TEST_F(ElementCapabilitiesInstanceTest, NamesFailAtOnceOnALightPathWithoutHandle) {
  useTree({blueLight("1")});
  // The fourth key completes the light's path; it loses its handle right after.
  const auto fault = broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), 4));
  const Outcome outcome = enumerateNames();
  EXPECT_EQ(broker_.faultFireCount(fault), 1u);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kNamesLightPathNullText));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kNamesLightPathNullText)});
  expectLines({entering(kEnumNames, kFile, kNamesList)});
}

TEST_F(ElementCapabilitiesInstanceTest, NamesKeepTheFirstPairWhenTheSecondLightPathLosesItsHandle) {
  useTree({blueLight("1"), blueLight("2")});
  broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), 8));
  const Outcome outcome = enumerateNames();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kNamesLightPathNullText));
  EXPECT_EQ(outcome.paths(), std::vector<ObjectPathValue>{pairName("Blue Light:1")});
  EXPECT_EQ(outcome.count(ResultKind::ObjectPath), 1u);
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kNamesLightPathNullText)});
  expectLines({entering(kEnumNames, kFile, kNamesList)});
}

TEST_F(ElementCapabilitiesInstanceTest, NamesFailOnACapabilitiesPathWithoutHandle) {
  useTree({blueLight("1")});
  // Four keys for the light, then the capabilities path's one key.
  broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), 5));
  const Outcome outcome = enumerateNames();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kNamesCapabilitiesPathNullStatus));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kNamesCapabilitiesPathNullTrace)});
  expectLines({entering(kEnumNames, kFile, kNamesList)});
}

TEST_F(ElementCapabilitiesInstanceTest, NamesFailWhenTheAssociationPathCannotBeMade) {
  useTree({blueLight("1")});
  // Paths made: the light, the capabilities, then the association.
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 3));
  const Outcome outcome = enumerateNames();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kNamesAssociationPathStatus));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kNamesAssociationPathTrace)});
  expectLines({entering(kEnumNames, kFile, kNamesList)});
}

TEST_F(ElementCapabilitiesInstanceTest,
       NamesKeepTheFirstPairWhenTheSecondAssociationPathHasNoHandle) {
  useTree({blueLight("1"), blueLight("2")});
  // Two lights, then per light its capabilities path and its association path.
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewObjectPath, 6));
  const Outcome outcome = enumerateNames();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kNamesAssociationPathStatus));
  EXPECT_EQ(outcome.paths(), std::vector<ObjectPathValue>{pairName("Blue Light:1")});
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kNamesAssociationPathTrace)});
  expectLines({entering(kEnumNames, kFile, kNamesList)});
}

TEST_F(ElementCapabilitiesInstanceTest,
       EnumInstanceNamesEndsWithTheFactoryStatusWhenALightPathFails) {
  useTree({blueLight("1")});
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
  const Outcome outcome = enumerateNames();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, "Create CMPIObjectPath failed."));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kLightPathFailedTrace});
  expectLines({entering(kEnumNames, kFile, kNamesList)});
}

TEST_F(ElementCapabilitiesInstanceTest, CapabilitiesFailureOnTheSecondLightKeepsTheFirstName) {
  useTree({blueLight("1"), blueLight("2")});
  // Lights 1 and 2, capabilities and association of light 1, then capabilities of light 2.
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 5));
  const Outcome outcome = enumerateNames();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, "Create CMPIObjectPath failed"));
  EXPECT_EQ(outcome.paths(), std::vector<ObjectPathValue>{pairName("Blue Light:1")});
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kCapPathFailedTrace});
  expectLines({entering(kEnumNames, kFile, kNamesList)});
}

// ---------------------------------------------------------------------------------------------
// EnumInstances
// ---------------------------------------------------------------------------------------------

TEST_F(ElementCapabilitiesInstanceTest, EnumInstancesWithoutLightsStillEndsNormally) {
  // The builder fails for want of light paths; unlike EnumInstanceNames, the enumeration ends with
  // its exit line and CMReturnDone.
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.results[0].kind, ResultKind::Done);
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{kNoLightsTrace, warning(kBuilderNoLightPathsTrace)}));
  EXPECT_TRUE(newStrings(outcome).empty());
  expectBuilderFailureLines(kEnum, kEnumList);
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstancesPairsEveryLightWithTheCapabilities) {
  useTree({blueLight("2"), blueLight("10"), blueLight("1")});
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 3u);
  // The factory's order: the DeviceIDs compared byte by byte.
  expectPair(instances[0], "Blue Light:1");
  expectPair(instances[1], "Blue Light:10");
  expectPair(instances[2], "Blue Light:2");
  EXPECT_EQ(instances[0].path(), pairName("Blue Light:1"));
  EXPECT_EQ(outcome.results.back().kind, ResultKind::Done);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_TRUE(traces(outcome).empty());
  expectLines({entering(kEnum, kFile, kEnumList), entering(kBuilder, kFile, kBuilderList),
               exiting(kBuilder, kFile, kBuilderList), exiting(kEnum, kFile, kEnumList)});
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstancesPutsBothEndsInTheNamespaceOfTheRequest) {
  useTree({blueLight("1")});
  const Outcome outcome = enumerate(std::nullopt, "root/other");
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 1u);
  expectPair(instances[0], "Blue Light:1", "root/other");
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstancesFiltersWithTheGenericRoleNamesAsKeys) {
  useTree({blueLight("1"), blueLight("2")});
  const Outcome outcome = enumerate(std::vector<std::string>{"ManagedElement"});
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 2u);
  for (const InstanceValue& instance : instances) {
    ASSERT_EQ(instance.propertyCount(), 1u) << instance;
    EXPECT_TRUE(instance.has("ManagedElement"));
  }
  const std::string filter = "({ManagedElement}, {Antecedent, Dependent})";
  EXPECT_EQ(filters(outcome), (std::vector<std::string>{filter, filter}));
  expectLines({entering(kEnum, kFile, kEnumListWithProperties),
               entering(kBuilder, kFile, " ref=PTR properties=PTR instances=PTR"),
               exiting(kBuilder, kFile, " ref=PTR properties=PTR instances=PTR"),
               exiting(kEnum, kFile, kEnumListWithProperties)});
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstancesWithAnEmptyPropertyListSetsNeitherEnd) {
  // The key list names "Antecedent" and "Dependent", so neither reference survives the filter.
  useTree({blueLight("1")});
  const Outcome outcome = enumerate(std::vector<std::string>{});
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 1u);
  EXPECT_EQ(instances[0].propertyCount(), 0u) << instances[0];
  EXPECT_EQ(outcome.doneCount, 1u);
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstancesPropertyListEndsAtItsFirstNullEntry) {
  useTree({blueLight("1")});
  const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
    static const char* list[] = {"Capabilities", nullptr, "ManagedElement", nullptr};
    return mi()->ft->enumerateInstances(mi(), request.context(), request.result(),
                                        request.classPath(kAssocClass), list);
  });
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 1u);
  ASSERT_EQ(instances[0].propertyCount(), 1u) << instances[0];
  EXPECT_EQ(*instances[0].find("Capabilities"), Value(capabilitiesRef()));
  EXPECT_EQ(outcome.doneCount, 1u);
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstancesHandsOverAnInstanceTheBrokerCouldNotMake) {
  useTree({blueLight("1"), blueLight("2")});
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.results.size(), 3u);
  EXPECT_EQ(outcome.results[0].kind, ResultKind::Instance);
  EXPECT_EQ(outcome.results[0].state, ObjectState::NullPointer);
  ASSERT_EQ(outcome.instances().size(), 1u);
  expectPair(outcome.instances()[0], "Blue Light:2");
  EXPECT_EQ(outcome.results[2].kind, ResultKind::Done);
  EXPECT_TRUE(traces(outcome).empty());
}

TEST_F(ElementCapabilitiesInstanceTest, EnumInstancesHandsOverAnInstanceWithoutHandleBare) {
  useTree({blueLight("1")});
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewInstance, 1));
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.results.size(), 2u);
  EXPECT_EQ(outcome.results[0].kind, ResultKind::Instance);
  EXPECT_EQ(outcome.results[0].state, ObjectState::NullHandle);
  // Nothing is set on it.
  EXPECT_EQ(callCount(outcome, "CMPIInstanceFT", "setProperty"), 0u);
  EXPECT_EQ(callCount(outcome, "CMPIInstanceFT", "setPropertyFilter"), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
}

// ---------------------------------------------------------------------------------------------
// Failure rows of the builder, through EnumInstances and GetInstance. The builder's own status
// never reaches the operation: its texts are seen only in what it asked CMNewString to make.
// ---------------------------------------------------------------------------------------------

TEST_F(ElementCapabilitiesInstanceTest, InstancesAreNoneWhenTheLightPathsCannotBeMade) {
  useTree({blueLight("1")});
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewObjectPath, 1));
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{kLightPathFailedTrace, warning(kBuilderNoLightPathsTrace)}));
  // Only the factory's own message; the builder's failure for want of light paths has none.
  EXPECT_EQ(newStrings(outcome), std::vector<std::string>{"Create CMPIObjectPath failed."});
  expectBuilderFailureLines(kEnum, kEnumList);
}

TEST_F(ElementCapabilitiesInstanceTest, InstancesAreNoneOnALightPathWithoutHandle) {
  useTree({blueLight("1")});
  const auto fault = broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), 4));
  const Outcome outcome = enumerate();
  EXPECT_EQ(broker_.faultFireCount(fault), 1u);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kBuilderLightPathNullTrace)});
  EXPECT_EQ(newStrings(outcome), std::vector<std::string>{kBuilderLightPathNullStatus});
  expectBuilderFailureLines(kEnum, kEnumList);
}

TEST_F(ElementCapabilitiesInstanceTest, InstancesAreNoneWhenTheSecondLightPathLosesItsHandle) {
  // The first pair was made, but a failing builder hands nothing to EnumInstances.
  useTree({blueLight("1"), blueLight("2")});
  broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), 8));
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(callCount(outcome, "CMPIBrokerEncFT", "newInstance"), 1u);
  EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kBuilderLightPathNullTrace)});
  EXPECT_EQ(newStrings(outcome), std::vector<std::string>{kBuilderLightPathNullStatus});
  expectBuilderFailureLines(kEnum, kEnumList);
}

TEST_F(ElementCapabilitiesInstanceTest, InstancesAreNoneWhenTheCapabilitiesPathsCannotBeMade) {
  useTree({blueLight("1")});
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 2));
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kCapPathFailedTrace,
                                                       warning(kBuilderNoCapabilitiesPathsTrace)}));
  EXPECT_EQ(newStrings(outcome), std::vector<std::string>{"Create CMPIObjectPath failed"});
  expectBuilderFailureLines(kEnum, kEnumList);
}

TEST_F(ElementCapabilitiesInstanceTest,
       InstancesAreNoneWhenTheSecondLightsCapabilitiesPathCannotBeMade) {
  useTree({blueLight("1"), blueLight("2")});
  // Lights 1 and 2, capabilities and association of light 1, then capabilities of light 2.
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 5));
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(callCount(outcome, "CMPIBrokerEncFT", "newInstance"), 1u);
  EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kCapPathFailedTrace,
                                                       warning(kBuilderNoCapabilitiesPathsTrace)}));
  expectBuilderFailureLines(kEnum, kEnumList);
}

TEST_F(ElementCapabilitiesInstanceTest,
       InstancesAreNoneWhenALightPathLosesItsHandleAfterItsNamespaceIsSet) {
  useTree({blueLight("1")});
  // The factory sets the light's namespace (1), then the builder sets it again (2): the path
  // passes the first check and fails the one before the capabilities.
  const auto fault =
      broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathSetNameSpace(), 2));
  const Outcome outcome = enumerate();
  EXPECT_EQ(broker_.faultFireCount(fault), 1u);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kBuilderCapabilitiesCheckTrace)});
  EXPECT_EQ(newStrings(outcome), std::vector<std::string>{kBuilderCapabilitiesCheckStatus});
  expectBuilderFailureLines(kEnum, kEnumList);
}

TEST_F(ElementCapabilitiesInstanceTest, CapabilitiesPathWithoutHandleIsNotCheckedByTheBuilder) {
  // The inner check looks at the light path only: a capabilities path without a handle goes
  // into the pair as it is, and the reference cannot be read.
  useTree({blueLight("1")});
  broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), 5));
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(traces(outcome).empty());
  EXPECT_EQ(outcome.count(ResultKind::Instance), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
  expectLines({entering(kEnum, kFile, kEnumList), entering(kBuilder, kFile, kBuilderList),
               exiting(kBuilder, kFile, kBuilderList), exiting(kEnum, kFile, kEnumList)});
}

TEST_F(ElementCapabilitiesInstanceTest,
       InstancesAreNoneWhenTheAssociationPathIsNotMadeOrHasNoHandle) {
  for (const Fault& fault : {Fault::nullResult(CreatingFunction::NewObjectPath, 3),
                             Fault::nullHandle(CreatingFunction::NewObjectPath, 3)}) {
    SCOPED_TRACE(::testing::PrintToString(fault.kind));
    useTree({blueLight("1")});
    clearLog();
    broker_.clearFaults();
    broker_.armFault(fault);
    const Outcome outcome = enumerate();
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
    EXPECT_EQ(outcome.doneCount, 1u);
    EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kBuilderAssociationPathTrace)});
    EXPECT_EQ(newStrings(outcome), std::vector<std::string>{kBuilderAssociationPathStatus});
    expectBuilderFailureLines(kEnum, kEnumList);
  }
}

TEST_F(ElementCapabilitiesInstanceTest, BuilderFailureThroughGetInstanceStillEndsNormally) {
  useTree({blueLight("1")});
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 3));
  const Outcome outcome = get(requestedPair("Blue Light:1"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(kBuilderAssociationPathTrace)});
  EXPECT_EQ(newStrings(outcome), std::vector<std::string>{kBuilderAssociationPathStatus});
  expectBuilderFailureLines(kGet, kGetList);
}

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceWithoutLightsFindsNothing) {
  const Outcome outcome = get(requestedPair("Blue Light:1"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.results[0].kind, ResultKind::Done);
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{kNoLightsTrace, warning(kBuilderNoLightPathsTrace)}));
  expectBuilderFailureLines(kGet, kGetList);
}

// ---------------------------------------------------------------------------------------------
// GetInstance
// ---------------------------------------------------------------------------------------------

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceWithoutKeysFailsButStillCallsDone) {
  useTree({blueLight("1")});
  const std::string text = "At least one key should be passed";
  const Outcome outcome = get(classPath(kAssocClass));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, text));
  ASSERT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.results[0].kind, ResultKind::Done);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(text)});
  // The builder is not called.
  expectLines({entering(kGet, kFile, kGetList), exiting(kGet, kFile, kGetList)});
}

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceOfANullPathCountsAsWithoutKeys) {
  useTree({blueLight("1")});
  const std::string text = "At least one key should be passed";
  const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
    return mi()->ft->getInstance(mi(), request.context(), request.result(), nullptr, nullptr);
  });
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, text));
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(text)});
  expectLines({entering(kGet, kFile, " mi=PTR ctx=PTR result=PTR cop=0 properties=0"),
               exiting(kGet, kFile, " mi=PTR ctx=PTR result=PTR cop=0 properties=0")});
}

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceReturnsTheRequestedPair) {
  useTree({blueLight("1"), blueLight("2"), blueLight("3")});
  const Outcome outcome = get(requestedPair("Blue Light:2"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 1u);
  expectPair(instances[0], "Blue Light:2");
  ASSERT_EQ(outcome.results.size(), 2u);
  EXPECT_EQ(outcome.results[1].kind, ResultKind::Done);
  EXPECT_TRUE(traces(outcome).empty());
  expectLines({entering(kGet, kFile, kGetList), entering(kBuilder, kFile, kBuilderList),
               exiting(kBuilder, kFile, kBuilderList), exiting(kGet, kFile, kGetList)});
}

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceBuildsInTheNamespaceOfTheRequestedPath) {
  useTree({blueLight("1")});
  const Outcome outcome = get(requestedPair("Blue Light:1", "root/other"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 1u);
  expectPair(instances[0], "Blue Light:1", "root/other");
}

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceOfAnUnknownPairReturnsNothingAndOk) {
  useTree({blueLight("1")});
  const Outcome outcome = get(requestedPair("Blue Light:9"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.results[0].kind, ResultKind::Done);
  EXPECT_TRUE(traces(outcome).empty());
  expectLines({entering(kGet, kFile, kGetList), entering(kBuilder, kFile, kBuilderList),
               exiting(kBuilder, kFile, kBuilderList), exiting(kGet, kFile, kGetList)});
}

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceWithOnlyOneOfTheTwoKeysReturnsNothing) {
  useTree({blueLight("1")});
  ObjectPathValue path(kNameSpace, kAssocClass);
  path.addKey("ManagedElement", Value(lightRef("Blue Light:1")));
  const Outcome outcome = get(path);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
}

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceSkipsAPairTheBrokerCouldNotMake) {
  useTree({blueLight("1"), blueLight("2")});
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome skipped = get(requestedPair("Blue Light:1"));
  EXPECT_EQ(skipped.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(skipped.results.size(), 1u);
  EXPECT_EQ(skipped.results[0].kind, ResultKind::Done);

  broker_.clearFaults();
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewInstance, 1));
  const Outcome other = get(requestedPair("Blue Light:2"));
  EXPECT_EQ(other.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(other.instances().size(), 1u);
  expectPair(other.instances()[0], "Blue Light:2");
  EXPECT_EQ(other.count(ResultKind::Instance), 1u);
  EXPECT_EQ(other.doneCount, 1u);
}

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceAppliesThePropertyList) {
  useTree({blueLight("1")});
  const Outcome outcome = get(requestedPair("Blue Light:1"),
                              std::vector<std::string>{"Capabilities", "ManagedElement"});
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.instances().size(), 1u);
  expectPair(outcome.instances()[0], "Blue Light:1");
  EXPECT_EQ(filters(outcome),
            std::vector<std::string>{"({Capabilities, ManagedElement}, {Antecedent, Dependent})"});
}

TEST_F(ElementCapabilitiesInstanceTest, GetInstanceWithAListThatDropsAReferenceMatchesNothing) {
  // The filter keeps "Antecedent" and "Dependent" as keys, not the two references: an instance
  // without one of them no longer carries the requested path, so nothing is found.
  useTree({blueLight("1")});
  const Outcome outcome =
      get(requestedPair("Blue Light:1"), std::vector<std::string>{"ManagedElement"});
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.count(ResultKind::Instance), 0u);
  EXPECT_EQ(outcome.doneCount, 1u);
}

}  // namespace
