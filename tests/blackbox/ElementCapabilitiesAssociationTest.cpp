// KESTA_BlueLightElementCapabilities, association side, through the dlopen-loaded library:
// Associators, AssociatorNames, References and ReferenceNames from a light, from the
// capabilities record and from paths this association does not serve, with every optional
// argument also given as NULL, as object managers send them.
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
using cmpihost::OptionalText;
using cmpihost::Outcome;
using cmpihost::PropertyList;
using cmpihost::ResultKind;
using cmpihost::StatusValue;
using cmpihost::Value;
using testsupport::blueLight;

const std::string kCategory = "Varnel.BlueLightElementCapabilitiesProvider";
const std::string kFactoryCategory = "Varnel.BlueLightObjFactory";
const std::string kFile = "BlueLightElementCapabilitiesProvider.cpp";
const std::string kFactoryFile = "BlueLightObjFactory.cpp";
const std::string kAssocClass = "KESTA_BlueLightElementCapabilities";
const std::string kLightClass = "KESTA_BlueLight";
const std::string kCapabilitiesClass = "KESTA_BlueLightCapabilities";
const std::string kComponent = "BlueLightElementCapabilitiesProvider";

const std::string kAssociators = "BlueLightElementCapabilities_Associators";
const std::string kAssociatorNames = "BlueLightElementCapabilities_AssociatorNames";
const std::string kReferences = "BlueLightElementCapabilities_References";
const std::string kReferenceNames = "BlueLightElementCapabilities_ReferenceNames";

const std::string kToCapabilities =
    "1 " + kComponent + ": Target Class is BlueLightCapabilitiesClass";
const std::string kToLights = "1 " + kComponent + ": Target Class is BlueLightClass";
const std::string kNoLightsTrace = "1 BlueLightProfileProvider: ***No instance found***";

std::string warning(const std::string& text) { return "2 " + kComponent + ": " + text; }

// A parameter list as the module writes it: a key and its text for each argument, a NULL text
// writing nothing and ending the list there (the stream is left failed).
std::string parameterList(const std::string& start,
                          const std::vector<std::pair<std::string, OptionalText>>& texts) {
  std::string list = start;
  for (const auto& [key, text] : texts) {
    list += key;
    if (!text) return list;
    list += *text;
  }
  return list;
}

const std::string kStart = " mi=PTR ctx=PTR result=PTR ref=PTR";

std::string associatorsList(const OptionalText& assocClass, const OptionalText& resultClass,
                            const OptionalText& role, const OptionalText& resultRole,
                            const std::string& properties) {
  return parameterList(kStart, {{" _RefLeftClass=", assocClass},
                                {" _RefRightClass=", resultClass},
                                {" role=", role},
                                {" resultRole=", resultRole},
                                {" properties=", properties}});
}

std::string associatorNamesList(const OptionalText& assocClass, const OptionalText& resultClass,
                                const OptionalText& role, const OptionalText& resultRole) {
  return parameterList(kStart, {{" _RefLeftClass=", assocClass},
                                {" _RefRightClass=", resultClass},
                                {" role=", role},
                                {" resultRole=", resultRole}});
}

std::string referencesList(const OptionalText& resultClass, const OptionalText& role,
                           const std::string& properties) {
  return parameterList(
      kStart, {{" resultClass=", resultClass}, {" role=", role}, {" properties=", properties}});
}

std::string referenceNamesList(const OptionalText& resultClass, const OptionalText& role) {
  return parameterList(kStart, {{" resultClass=", resultClass}, {" role=", role}});
}

class ElementCapabilitiesAssociationTest : public blackbox::BlackboxTest {
 protected:
  CMPIAssociationMI* mi() { return associationMI(kElementCapabilitiesProvider); }

  Outcome associators(const ObjectPathValue& path, const OptionalText& assocClass,
                      const OptionalText& resultClass = std::nullopt,
                      const OptionalText& role = std::nullopt,
                      const OptionalText& resultRole = std::nullopt,
                      const PropertyList& properties = std::nullopt) {
    return cmpihost::associators(broker_, mi(), path, assocClass, resultClass, role, resultRole,
                                 properties);
  }
  Outcome associatorNames(const ObjectPathValue& path, const OptionalText& assocClass,
                          const OptionalText& resultClass = std::nullopt,
                          const OptionalText& role = std::nullopt,
                          const OptionalText& resultRole = std::nullopt) {
    return cmpihost::associatorNames(broker_, mi(), path, assocClass, resultClass, role,
                                     resultRole);
  }
  Outcome references(const ObjectPathValue& path, const OptionalText& resultClass = std::nullopt,
                     const OptionalText& role = std::nullopt,
                     const PropertyList& properties = std::nullopt) {
    return cmpihost::references(broker_, mi(), path, resultClass, role, properties);
  }
  Outcome referenceNames(const ObjectPathValue& path,
                         const OptionalText& resultClass = std::nullopt,
                         const OptionalText& role = std::nullopt) {
    return cmpihost::referenceNames(broker_, mi(), path, resultClass, role);
  }

  static ObjectPathValue lightRef(const std::string& deviceID,
                                  const std::string& nameSpace = kNameSpace) {
    return lightPath(deviceID, nameSpace).setHost(kSystemName);
  }
  static ObjectPathValue capabilitiesRef(const std::string& nameSpace = kNameSpace) {
    return capabilitiesPath(nameSpace).setHost(kSystemName);
  }
  static InstanceValue capabilitiesInstance(const std::string& nameSpace = kNameSpace) {
    InstanceValue instance(capabilitiesRef(nameSpace));
    instance.set("InstanceID", Value("KESTA:BlueLightCapabilities1"));
    instance.set("RequestedAlarmStatesSupported",
                 Value::array(CMPI_uint16, {Value::uint16(1), Value::uint16(2), Value::uint16(3)}));
    return instance;
  }
  // The path of one association object as References and ReferenceNames make it.
  static ObjectPathValue referenceName(const ObjectPathValue& managedElement,
                                       const ObjectPathValue& capabilities,
                                       const std::string& nameSpace = kNameSpace) {
    ObjectPathValue path(nameSpace, kAssocClass);
    path.setHost(kSystemName);
    path.addKey("ManagedElement", Value(managedElement));
    path.addKey("Capabilities", Value(capabilities));
    return path;
  }

  static std::vector<ObjectPathValue> instancePaths(const Outcome& outcome) {
    std::vector<ObjectPathValue> paths;
    for (const InstanceValue& instance : outcome.instances()) paths.push_back(instance.path());
    return paths;
  }

  void expectLines(const std::vector<std::string>& expected) const {
    EXPECT_EQ(log(kCategory, "LOG"), expected);
    EXPECT_EQ(log(kCategory, "TRACE"), expected);
  }

  // The entry lines of the factory's target resolution, as it was asked.
  std::vector<std::string> targetResolutionEntries() const {
    std::vector<std::string> lines;
    for (const std::string& line : log(kFactoryCategory, "LOG")) {
      if (line.rfind("ENTERING: get_assoc_targetClass_", 0) == 0) lines.push_back(line);
    }
    return lines;
  }

  // Every entry and exit line of the factory's target resolution, in order.
  std::vector<std::string> targetResolutionLines() const {
    std::vector<std::string> lines;
    for (const std::string& line : log(kFactoryCategory, "LOG")) {
      if (line.rfind("ENTERING: get_assoc_targetClass_", 0) == 0 ||
          line.rfind("EXITING: get_assoc_targetClass_", 0) == 0) {
        lines.push_back(line);
      }
    }
    return lines;
  }

  static std::size_t callCount(const Outcome& outcome, const std::string& table,
                               const std::string& function) {
    return static_cast<std::size_t>(std::count_if(
        outcome.calls.begin(), outcome.calls.end(),
        [&](const CallRecord& call) { return call.table == table && call.function == function; }));
  }
};

// ---------------------------------------------------------------------------------------------
// Associators
// ---------------------------------------------------------------------------------------------

TEST_F(ElementCapabilitiesAssociationTest, AssociatorsFromALightGiveTheCapabilities) {
  useTree({blueLight("1"), blueLight("2")});
  const Outcome outcome = associators(lightPath("Blue Light:1"), kAssocClass, kCapabilitiesClass,
                                      std::string("ManagedElement"), std::string("Capabilities"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.instances(), std::vector<InstanceValue>{capabilitiesInstance()});
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kToCapabilities});
  const std::string list =
      associatorsList(kAssocClass, kCapabilitiesClass, std::string("ManagedElement"),
                      std::string("Capabilities"), "0");
  expectLines({entering(kAssociators, kFile, list), exiting(kAssociators, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorsFromTheCapabilitiesGiveEveryLight) {
  useTree({blueLight("2"), blueLight("1"), blueLight("3")});
  const Outcome outcome = associators(capabilitiesPath(), kAssocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(instancePaths(outcome),
            (std::vector<ObjectPathValue>{lightRef("Blue Light:1"), lightRef("Blue Light:2"),
                                          lightRef("Blue Light:3")}));
  for (const InstanceValue& light : outcome.instances()) {
    EXPECT_EQ(light.className(), kLightClass);
    EXPECT_EQ(light.propertyCount(), 15u) << light;
  }
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kToLights});
  const std::string list =
      associatorsList(kAssocClass, std::nullopt, std::nullopt, std::nullopt, "0");
  expectLines({entering(kAssociators, kFile, list), exiting(kAssociators, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorsFromALightTheTreeDoesNotKnowStillAnswer) {
  // The walk from a light is not tied to that light: one capabilities record serves them all.
  useTree({blueLight("1")});
  const Outcome outcome = associators(lightPath("Blue Light:99"), kAssocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.instances(), std::vector<InstanceValue>{capabilitiesInstance()});
  EXPECT_EQ(outcome.doneCount, 0u);
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorsFromTheCapabilitiesWithoutLightsEndNormally) {
  // The light instances come from an enumeration that reports no failure for an empty tree.
  const Outcome outcome = associators(capabilitiesPath(), kAssocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kToLights});
  const std::string list =
      associatorsList(kAssocClass, std::nullopt, std::nullopt, std::nullopt, "0");
  expectLines({entering(kAssociators, kFile, list), exiting(kAssociators, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorsIgnoreTheResultClassAndTheRoles) {
  useTree({blueLight("1")});
  const Outcome named = associators(lightPath("Blue Light:1"), kAssocClass);
  clearLog();
  const Outcome other = associators(lightPath("Blue Light:1"), kAssocClass, kLightClass,
                                    std::string("Nobody"), std::string("Nothing"));
  EXPECT_EQ(other.status, named.status);
  EXPECT_EQ(other.instances(), named.instances());
  EXPECT_EQ(other.instances(), std::vector<InstanceValue>{capabilitiesInstance()});
  EXPECT_EQ(traces(other), traces(named));
  const std::string list =
      associatorsList(kAssocClass, kLightClass, std::string("Nobody"), std::string("Nothing"), "0");
  expectLines({entering(kAssociators, kFile, list), exiting(kAssociators, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorsPassThePropertyListToTheInstances) {
  useTree({blueLight("1")});
  const Outcome outcome = associators(capabilitiesPath(), kAssocClass, std::nullopt, std::nullopt,
                                      std::nullopt, std::vector<std::string>{"ElementName"});
  ASSERT_EQ(outcome.instances().size(), 1u);
  const InstanceValue light = outcome.instances()[0];
  // The keys and the one property asked for.
  EXPECT_EQ(light.propertyCount(), 5u) << light;
  EXPECT_EQ(*light.find("ElementName"), Value("Blue Light"));
  EXPECT_FALSE(light.has("Caption"));
  const std::string list =
      associatorsList(kAssocClass, std::nullopt, std::nullopt, std::nullopt, "PTR");
  expectLines({entering(kAssociators, kFile, list), exiting(kAssociators, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorsPropertyListEndsAtItsFirstNullEntry) {
  useTree({blueLight("1")});
  const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
    static const char* list[] = {"HealthState", nullptr, "ElementName", nullptr};
    return mi()->ft->associators(mi(), request.context(), request.result(),
                                 request.objectPath(capabilitiesPath()), kAssocClass.c_str(),
                                 nullptr, nullptr, nullptr, list);
  });
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.instances().size(), 1u);
  const InstanceValue light = outcome.instances()[0];
  EXPECT_EQ(light.propertyCount(), 5u) << light;
  EXPECT_TRUE(light.has("HealthState"));
  EXPECT_FALSE(light.has("ElementName"));
  EXPECT_EQ(outcome.doneCount, 0u);
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorsWithAnEmptyPropertyListKeepOnlyTheKey) {
  useTree({blueLight("1")});
  const Outcome outcome = associators(lightPath("Blue Light:1"), kAssocClass, std::nullopt,
                                      std::nullopt, std::nullopt, std::vector<std::string>{});
  ASSERT_EQ(outcome.instances().size(), 1u);
  const InstanceValue capabilities = outcome.instances()[0];
  ASSERT_EQ(capabilities.propertyCount(), 1u) << capabilities;
  EXPECT_EQ(*capabilities.find("InstanceID"), Value("KESTA:BlueLightCapabilities1"));
}

// ---------------------------------------------------------------------------------------------
// AssociatorNames
// ---------------------------------------------------------------------------------------------

TEST_F(ElementCapabilitiesAssociationTest, AssociatorNamesFromALightGiveTheCapabilitiesPath) {
  useTree({blueLight("1")});
  const Outcome outcome =
      associatorNames(lightPath("Blue Light:1"), kAssocClass, kCapabilitiesClass,
                      std::string("ManagedElement"), std::string("Capabilities"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.paths(), std::vector<ObjectPathValue>{capabilitiesRef()});
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kToCapabilities});
  const std::string list = associatorNamesList(
      kAssocClass, kCapabilitiesClass, std::string("ManagedElement"), std::string("Capabilities"));
  expectLines({entering(kAssociatorNames, kFile, list), exiting(kAssociatorNames, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorNamesFromTheCapabilitiesGiveEveryLight) {
  useTree({blueLight("2"), blueLight("1")});
  const Outcome outcome = associatorNames(capabilitiesPath(), kAssocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.paths(),
            (std::vector<ObjectPathValue>{lightRef("Blue Light:1"), lightRef("Blue Light:2")}));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kToLights});
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorNamesPutEveryPathInTheSourceNamespace) {
  useTree({blueLight("1"), blueLight("2")});
  const Outcome outcome = associatorNames(capabilitiesPath("root/other"), kAssocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.paths(),
            (std::vector<ObjectPathValue>{lightRef("Blue Light:1", "root/other"),
                                          lightRef("Blue Light:2", "root/other")}));
  // Every path gets the source's namespace once more just before it is handed over.
  std::vector<std::string> lastSets;
  for (std::size_t index = 1; index < outcome.calls.size(); ++index) {
    const CallRecord& call = outcome.calls[index];
    if (call.function == "returnObjectPath") {
      const CallRecord& before = outcome.calls[index - 1];
      lastSets.push_back(before.function + " " + before.args.at(1));
    }
  }
  EXPECT_EQ(lastSets,
            (std::vector<std::string>{"setNameSpace root/other", "setNameSpace root/other"}));
}

TEST_F(ElementCapabilitiesAssociationTest,
       AssociatorNamesFromTheCapabilitiesWithoutLightsEndEarly) {
  // Unlike Associators, the light paths come from an enumeration that reports an empty tree:
  // the operation ends with OK at once, without its exit line.
  const Outcome outcome = associatorNames(capabilitiesPath(), kAssocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToLights, kNoLightsTrace}));
  expectLines(
      {entering(kAssociatorNames, kFile,
                associatorNamesList(kAssocClass, std::nullopt, std::nullopt, std::nullopt))});
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorNamesEndWithTheFactoryStatusWhenAPathFails) {
  useTree({blueLight("1"), blueLight("2")});
  // The target path first, then the light paths: the second light's fails.
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 3));
  const Outcome outcome = associatorNames(capabilitiesPath(), kAssocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, "Create CMPIObjectPath failed."));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{kToLights,
                                      "2 BlueLightProfileProvider: Create "
                                      "CMPIObjectPath                     failed for "
                                      "RecordLogClass."}));
  expectLines(
      {entering(kAssociatorNames, kFile,
                associatorNamesList(kAssocClass, std::nullopt, std::nullopt, std::nullopt))});
}

// ---------------------------------------------------------------------------------------------
// No target
// ---------------------------------------------------------------------------------------------

struct NoTargetCase {
  std::string name;
  ObjectPathValue source;
  std::string assocClass;
};

TEST_F(ElementCapabilitiesAssociationTest, AssociatorsWithoutATargetFailWithTheirOwnMessage) {
  useTree({blueLight("1")});
  const std::vector<NoTargetCase> cases = {
      {"computer system", computerSystemPath(kSystemName), kAssocClass},
      {"other association from the capabilities", capabilitiesPath(),
       "KESTA_BlueLightSystemDevice"},
      {"lower case", lightPath("Blue Light:1"), "kesta_bluelightelementcapabilities"},
      {"schema class", ObjectPathValue(kNameSpace, "CIM_AlarmDevice"), kAssocClass},
  };
  const std::string text = "Object Path is NULL in Associators.";
  for (const NoTargetCase& c : cases) {
    SCOPED_TRACE(c.name);
    clearLog();
    const Outcome outcome = associators(c.source, c.assocClass);
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, text));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(text)});
    expectLines(
        {entering(kAssociators, kFile,
                  associatorsList(c.assocClass, std::nullopt, std::nullopt, std::nullopt, "0"))});
  }
}

TEST_F(ElementCapabilitiesAssociationTest, ATargetOfAnotherAssociationGivesNothingButEndsNormally) {
  // The light and the system-device association lead to the computer system class, which is
  // neither end of this association: nothing is looked up, and the operation ends with OK.
  useTree({blueLight("1")});
  const std::string toSystems =
      "1 BlueLightSystemDeviceProvider: Target Class is ComputerSystemClass";
  const Outcome outcome = associators(lightPath("Blue Light:1"), "KESTA_BlueLightSystemDevice");
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), std::vector<std::string>{toSystems});
  const std::string list =
      associatorsList("KESTA_BlueLightSystemDevice", std::nullopt, std::nullopt, std::nullopt, "0");
  expectLines({entering(kAssociators, kFile, list), exiting(kAssociators, kFile, list)});

  clearLog();
  const Outcome names = associatorNames(lightPath("Blue Light:1"), "KESTA_BlueLightSystemDevice");
  EXPECT_EQ(names.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(names.results.empty());
  EXPECT_EQ(traces(names), std::vector<std::string>{toSystems});
  const std::string namesList =
      associatorNamesList("KESTA_BlueLightSystemDevice", std::nullopt, std::nullopt, std::nullopt);
  expectLines(
      {entering(kAssociatorNames, kFile, namesList), exiting(kAssociatorNames, kFile, namesList)});
}

TEST_F(ElementCapabilitiesAssociationTest, AssociatorNamesWithoutATargetSayAssociatorsNames) {
  useTree({blueLight("1")});
  const std::string text = "Object Path is NULL in AssociatorsNames.";
  const Outcome outcome = associatorNames(computerSystemPath(kSystemName), kAssocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, text));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(text)});
  expectLines(
      {entering(kAssociatorNames, kFile,
                associatorNamesList(kAssocClass, std::nullopt, std::nullopt, std::nullopt))});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferencesWithoutATargetFailWithTheirOwnMessage) {
  useTree({blueLight("1")});
  const std::string text = "Object Path is NULL in References.";
  const Outcome outcome = references(computerSystemPath(kSystemName));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, text));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(text)});
  expectLines({entering(kReferences, kFile, referencesList(std::nullopt, std::nullopt, "0"))});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferenceNamesWithoutATargetFailWithTheirOwnMessage) {
  useTree({blueLight("1")});
  const std::string text = "Object Path is NULL in ReferenceNames.";
  const Outcome outcome =
      referenceNames(computerSystemPath(kSystemName), std::string("X"), std::string("Y"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, text));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), std::vector<std::string>{warning(text)});
  expectLines(
      {entering(kReferenceNames, kFile, referenceNamesList(std::string("X"), std::string("Y")))});
}

TEST_F(ElementCapabilitiesAssociationTest, ATargetPathTheBrokerCouldNotMakeCountsAsNoTarget) {
  useTree({blueLight("1")});
  const std::string text = "Object Path is NULL in Associators.";
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
  const Outcome outcome = associators(lightPath("Blue Light:1"), kAssocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, text));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToCapabilities, warning(text)}));
}

TEST_F(ElementCapabilitiesAssociationTest, ATargetPathThatLostItsHandleCountsAsNoTarget) {
  useTree({blueLight("1")});
  const std::string text = "Object Path is NULL in ReferenceNames.";
  // The target path's host name is set last; it loses its handle right after.
  const auto fault =
      broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathSetHostname(), 1));
  const Outcome outcome = referenceNames(capabilitiesPath());
  EXPECT_EQ(broker_.faultFireCount(fault), 1u);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, text));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToLights, warning(text)}));
  expectLines({entering(kReferenceNames, kFile, referenceNamesList(std::nullopt, std::nullopt))});
}

// ---------------------------------------------------------------------------------------------
// A NULL association class: object managers send one when the client named none, some of them
// to every association provider of the namespace whatever the source.
// ---------------------------------------------------------------------------------------------

// The operation's own lines show the argument as it came: the list stops after its key.
const std::string kNullClassList = kStart + " _RefLeftClass=";
// The target resolution is asked with the association's own class and no result class.
const std::string kAskedWithOwnClass =
    " broker=PTR ref=PTR _RefLeftClass=KESTA_BlueLightElementCapabilities _RefRightClass=";

TEST_F(ElementCapabilitiesAssociationTest, NullAssocClassFromALightActsAsTheOwnClass) {
  useTree({blueLight("1"), blueLight("2")});
  const Outcome named = associators(lightPath("Blue Light:1"), kAssocClass);
  clearLog();
  const Outcome unnamed = associators(lightPath("Blue Light:1"), std::nullopt);
  EXPECT_EQ(unnamed.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(unnamed.status, named.status);
  EXPECT_EQ(unnamed.results.size(), named.results.size());
  EXPECT_EQ(blackbox::handOverKinds(unnamed), std::vector<std::string>{"Instance Valid"});
  EXPECT_EQ(unnamed.instances(), named.instances());
  EXPECT_EQ(unnamed.instances(), std::vector<InstanceValue>{capabilitiesInstance()});
  EXPECT_EQ(unnamed.doneCount, 0u);
  EXPECT_EQ(traces(unnamed), traces(named));
  EXPECT_EQ(traces(unnamed), std::vector<std::string>{kToCapabilities});
  // The operation's own lines show the argument as it came: the list stops after its key.
  const std::string list = kStart + " _RefLeftClass=";
  expectLines({entering(kAssociators, kFile, list), exiting(kAssociators, kFile, list)});
  // The target resolution is asked with the association's own class.
  const std::string asked =
      " broker=PTR ref=PTR _RefLeftClass=KESTA_BlueLightElementCapabilities _RefRightClass=";
  EXPECT_EQ(
      targetResolutionEntries(),
      (std::vector<std::string>{entering("get_assoc_targetClass_ObjectPath", kFactoryFile, asked),
                                entering("get_assoc_targetClass_Name", kFactoryFile, asked)}));
}

TEST_F(ElementCapabilitiesAssociationTest, NullAssocClassFromTheCapabilitiesActsAsTheOwnClass) {
  useTree({blueLight("1"), blueLight("2")});
  const Outcome named = associators(capabilitiesPath(), kAssocClass, kLightClass);
  clearLog();
  const Outcome unnamed = associators(capabilitiesPath(), std::nullopt, kLightClass);
  EXPECT_EQ(unnamed.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(unnamed.status, named.status);
  EXPECT_EQ(unnamed.instances(), named.instances());
  EXPECT_EQ(blackbox::handOverKinds(unnamed),
            (std::vector<std::string>{"Instance Valid", "Instance Valid"}));
  EXPECT_EQ(instancePaths(unnamed),
            (std::vector<ObjectPathValue>{lightRef("Blue Light:1"), lightRef("Blue Light:2")}));
  for (const InstanceValue& light : unnamed.instances()) {
    EXPECT_EQ(light.className(), kLightClass);
    EXPECT_EQ(light.propertyCount(), 15u) << light;
  }
  EXPECT_EQ(unnamed.doneCount, 0u);
  EXPECT_EQ(traces(unnamed), traces(named));
  EXPECT_EQ(traces(unnamed), std::vector<std::string>{kToLights});
  const std::string list = kStart + " _RefLeftClass=";
  expectLines({entering(kAssociators, kFile, list), exiting(kAssociators, kFile, list)});
}

// This association does not start at a computer system. Named, it is the no-target failure;
// unnamed, the request is one that every association provider gets, and this one has nothing to
// add: success, nothing handed over, no warning, the entry and the exit line.
TEST_F(ElementCapabilitiesAssociationTest, NullAssocClassFromAComputerSystemGivesNothing) {
  useTree({blueLight("1")});
  const std::string text = "Object Path is NULL in Associators.";
  const Outcome named = associators(computerSystemPath(kSystemName), kAssocClass);
  EXPECT_EQ(named.status, StatusValue(CMPI_RC_ERR_FAILED, text));
  EXPECT_TRUE(named.results.empty());
  EXPECT_EQ(named.doneCount, 0u);
  EXPECT_EQ(traces(named), std::vector<std::string>{warning(text)});
  expectLines(
      {entering(kAssociators, kFile,
                associatorsList(kAssocClass, std::nullopt, std::nullopt, std::nullopt, "0"))});

  clearLog();
  const Outcome unnamed = associators(computerSystemPath(kSystemName), std::nullopt);
  EXPECT_EQ(unnamed.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(unnamed.results.empty());
  EXPECT_EQ(unnamed.doneCount, 0u);
  EXPECT_TRUE(traces(unnamed).empty());
  expectLines({entering(kAssociators, kFile, kNullClassList),
               exiting(kAssociators, kFile, kNullClassList)});
  // The resolution is still asked with the association's own class and finds no far end.
  EXPECT_EQ(targetResolutionLines(),
            (std::vector<std::string>{
                entering("get_assoc_targetClass_ObjectPath", kFactoryFile, kAskedWithOwnClass),
                entering("get_assoc_targetClass_Name", kFactoryFile, kAskedWithOwnClass),
                exiting("get_assoc_targetClass_ObjectPath", kFactoryFile, kAskedWithOwnClass)}));
}

TEST_F(ElementCapabilitiesAssociationTest, NullAssocClassNamesFromALightActAsTheOwnClass) {
  useTree({blueLight("1")});
  const Outcome named = associatorNames(lightPath("Blue Light:1"), kAssocClass);
  clearLog();
  const Outcome unnamed = associatorNames(lightPath("Blue Light:1"), std::nullopt);
  EXPECT_EQ(unnamed.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(unnamed.status, named.status);
  EXPECT_EQ(unnamed.paths(), named.paths());
  EXPECT_EQ(blackbox::handOverKinds(unnamed), std::vector<std::string>{"ObjectPath Valid"});
  EXPECT_EQ(unnamed.paths(), std::vector<ObjectPathValue>{capabilitiesRef()});
  EXPECT_EQ(unnamed.doneCount, 0u);
  EXPECT_EQ(traces(unnamed), traces(named));
  EXPECT_EQ(traces(unnamed), std::vector<std::string>{kToCapabilities});
  const std::string list = kStart + " _RefLeftClass=";
  expectLines({entering(kAssociatorNames, kFile, list), exiting(kAssociatorNames, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest,
       NullAssocClassNamesFromTheCapabilitiesActsAsTheOwnClass) {
  useTree({blueLight("1"), blueLight("2")});
  const Outcome named = associatorNames(capabilitiesPath(), kAssocClass);
  clearLog();
  const Outcome unnamed = associatorNames(capabilitiesPath(), std::nullopt);
  EXPECT_EQ(unnamed.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(unnamed.paths(), named.paths());
  EXPECT_EQ(blackbox::handOverKinds(unnamed),
            (std::vector<std::string>{"ObjectPath Valid", "ObjectPath Valid"}));
  EXPECT_EQ(unnamed.paths(),
            (std::vector<ObjectPathValue>{lightRef("Blue Light:1"), lightRef("Blue Light:2")}));
  EXPECT_EQ(unnamed.doneCount, 0u);
  EXPECT_EQ(traces(unnamed), traces(named));
  EXPECT_EQ(traces(unnamed), std::vector<std::string>{kToLights});
  const std::string list = kStart + " _RefLeftClass=";
  expectLines({entering(kAssociatorNames, kFile, list), exiting(kAssociatorNames, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, NullAssocClassNamesFromAComputerSystemGiveNothing) {
  useTree({blueLight("1")});
  const std::string text = "Object Path is NULL in AssociatorsNames.";
  const Outcome named = associatorNames(computerSystemPath(kSystemName), kAssocClass);
  EXPECT_EQ(named.status, StatusValue(CMPI_RC_ERR_FAILED, text));
  EXPECT_TRUE(named.results.empty());
  EXPECT_EQ(named.doneCount, 0u);
  EXPECT_EQ(traces(named), std::vector<std::string>{warning(text)});
  expectLines(
      {entering(kAssociatorNames, kFile,
                associatorNamesList(kAssocClass, std::nullopt, std::nullopt, std::nullopt))});

  clearLog();
  const Outcome unnamed = associatorNames(computerSystemPath(kSystemName), std::nullopt);
  EXPECT_EQ(unnamed.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(unnamed.results.empty());
  EXPECT_EQ(unnamed.doneCount, 0u);
  EXPECT_TRUE(traces(unnamed).empty());
  expectLines({entering(kAssociatorNames, kFile, kNullClassList),
               exiting(kAssociatorNames, kFile, kNullClassList)});
  EXPECT_EQ(targetResolutionLines(),
            (std::vector<std::string>{
                entering("get_assoc_targetClass_ObjectPath", kFactoryFile, kAskedWithOwnClass),
                entering("get_assoc_targetClass_Name", kFactoryFile, kAskedWithOwnClass),
                exiting("get_assoc_targetClass_ObjectPath", kFactoryFile, kAskedWithOwnClass)}));
}

// Only the two ends, by their exact class names, start this association; every other source
// gets nothing with a null class, the result class and roles making no difference.
TEST_F(ElementCapabilitiesAssociationTest, NullAssocClassFromAnyOtherClassGivesNothing) {
  useTree({blueLight("1")});
  const std::vector<ObjectPathValue> sources = {
      classPath("KESTA_ComputerSystem"), ObjectPathValue(kNameSpace, "CIM_AlarmDevice"),
      ObjectPathValue(kNameSpace, "kesta_bluelight"),
      ObjectPathValue(kNameSpace, "KESTA_BlueLightElementCapabilities"),
      computerSystemPath("elsewhere", "root/other")};
  for (const ObjectPathValue& source : sources) {
    SCOPED_TRACE(source.toString());
    clearLog();
    const Outcome outcome =
        associators(source, std::nullopt, kCapabilitiesClass, std::string("ManagedElement"),
                    std::string("Capabilities"), std::vector<std::string>{"InstanceID"});
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(outcome.doneCount, 0u);
    EXPECT_TRUE(traces(outcome).empty());
    expectLines({entering(kAssociators, kFile, kNullClassList),
                 exiting(kAssociators, kFile, kNullClassList)});

    clearLog();
    const Outcome names = associatorNames(source, std::nullopt, kLightClass);
    EXPECT_EQ(names.status, StatusValue(CMPI_RC_OK));
    EXPECT_TRUE(names.results.empty());
    EXPECT_EQ(names.doneCount, 0u);
    EXPECT_TRUE(traces(names).empty());
    expectLines({entering(kAssociatorNames, kFile, kNullClassList),
                 exiting(kAssociatorNames, kFile, kNullClassList)});
  }
}

// From an end, a far end the broker could not make is still the no-target failure with a null
// class: only the source decides that there is nothing to answer.
TEST_F(ElementCapabilitiesAssociationTest, NullAssocClassFromALightWithoutATargetPathStillFails) {
  useTree({blueLight("1")});
  for (bool namesOnly : {false, true}) {
    SCOPED_TRACE(namesOnly ? "AssociatorNames" : "Associators");
    const std::string text = namesOnly ? "Object Path is NULL in AssociatorsNames."
                                       : "Object Path is NULL in Associators.";
    const std::string& function = namesOnly ? kAssociatorNames : kAssociators;
    broker_.clearFaults();
    broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
    clearLog();
    const Outcome outcome = namesOnly ? associatorNames(lightPath("Blue Light:1"), std::nullopt)
                                      : associators(lightPath("Blue Light:1"), std::nullopt);
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, text));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(outcome.doneCount, 0u);
    EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToCapabilities, warning(text)}));
    expectLines({entering(function, kFile, kNullClassList)});
  }
  broker_.clearFaults();
}

TEST_F(ElementCapabilitiesAssociationTest, NullArgumentsCutTheListWhereTheyStand) {
  useTree({blueLight("1")});
  const std::string role = "ManagedElement";
  const Outcome outcome =
      associators(lightPath("Blue Light:1"), kAssocClass, std::nullopt, role, std::nullopt);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.instances(), std::vector<InstanceValue>{capabilitiesInstance()});
  const std::string list = kStart + " _RefLeftClass=" + kAssocClass + " _RefRightClass=";
  expectLines({entering(kAssociators, kFile, list), exiting(kAssociators, kFile, list)});

  clearLog();
  const Outcome names =
      associatorNames(lightPath("Blue Light:1"), kAssocClass, kCapabilitiesClass, role);
  EXPECT_EQ(names.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(names.paths(), std::vector<ObjectPathValue>{capabilitiesRef()});
  const std::string namesList = kStart + " _RefLeftClass=" + kAssocClass +
                                " _RefRightClass=" + kCapabilitiesClass + " role=" + role +
                                " resultRole=";
  expectLines(
      {entering(kAssociatorNames, kFile, namesList), exiting(kAssociatorNames, kFile, namesList)});
}

TEST_F(ElementCapabilitiesAssociationTest, EveryTextArgumentNullAtOnce) {
  useTree({blueLight("1")});
  const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
    return mi()->ft->associators(mi(), request.context(), request.result(),
                                 request.objectPath(lightPath("Blue Light:1")), nullptr, nullptr,
                                 nullptr, nullptr, nullptr);
  });
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.instances(), std::vector<InstanceValue>{capabilitiesInstance()});
  EXPECT_EQ(outcome.doneCount, 0u);
}

// ---------------------------------------------------------------------------------------------
// References and ReferenceNames
// ---------------------------------------------------------------------------------------------

TEST_F(ElementCapabilitiesAssociationTest, ReferencesFromTheCapabilitiesJoinEveryLight) {
  useTree({blueLight("2"), blueLight("1")});
  const ObjectPathValue source = capabilitiesPath();
  const Outcome outcome = references(source);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 2u);
  const std::vector<std::string> ids = {"Blue Light:1", "Blue Light:2"};
  for (std::size_t index = 0; index < ids.size(); ++index) {
    const InstanceValue& instance = instances[index];
    EXPECT_EQ(instance.className(), kAssocClass);
    ASSERT_EQ(instance.propertyCount(), 2u) << instance;
    EXPECT_EQ(*instance.find("ManagedElement"), Value(lightRef(ids[index])));
    // The source goes in as the client sent it.
    EXPECT_EQ(*instance.find("Capabilities"), Value(source));
    EXPECT_EQ(instance.path(), referenceName(lightRef(ids[index]), source));
  }
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kToLights});
  const std::string list = referencesList(std::nullopt, std::nullopt, "0");
  expectLines({entering(kReferences, kFile, list), exiting(kReferences, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferencesFromALightJoinItToTheCapabilities) {
  useTree({blueLight("1"), blueLight("2")});
  const ObjectPathValue source = lightPath("Blue Light:2");
  const Outcome outcome = references(source);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 1u);
  EXPECT_EQ(instances[0].className(), kAssocClass);
  ASSERT_EQ(instances[0].propertyCount(), 2u) << instances[0];
  EXPECT_EQ(instances[0].properties()[0].name, "ManagedElement");
  EXPECT_EQ(instances[0].properties()[0].value, Value(source));
  EXPECT_EQ(instances[0].properties()[1].name, "Capabilities");
  EXPECT_EQ(instances[0].properties()[1].value, Value(capabilitiesRef()));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kToCapabilities});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferencesShareOneAssociationPath) {
  useTree({blueLight("1"), blueLight("2"), blueLight("3")});
  const Outcome outcome = references(capabilitiesPath());
  ASSERT_EQ(outcome.instances().size(), 3u);
  std::vector<std::string> made;
  std::vector<std::string> instancePathsUsed;
  for (const CallRecord& call : outcome.calls) {
    if (call.function == "newObjectPath" && call.args.at(1) == kAssocClass) {
      made.push_back(call.args.at(0));
    }
    if (call.function == "newInstance") instancePathsUsed.push_back(call.args.at(0));
  }
  EXPECT_EQ(made, std::vector<std::string>{kNameSpace});
  const std::string shared = "//" + kSystemName + "/" + kNameSpace + ":" + kAssocClass;
  EXPECT_EQ(instancePathsUsed, (std::vector<std::string>{shared, shared, shared}));
}

TEST_F(ElementCapabilitiesAssociationTest, ReferencesIgnoreTheResultClassRoleAndPropertyList) {
  useTree({blueLight("1")});
  const Outcome plain = references(capabilitiesPath());
  clearLog();
  const Outcome outcome = references(capabilitiesPath(), std::string("CIM_Nothing"),
                                     std::string("Nobody"), std::vector<std::string>{"Nothing"});
  EXPECT_EQ(outcome.status, plain.status);
  EXPECT_EQ(outcome.instances(), plain.instances());
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(outcome.instances()[0].propertyCount(), 2u);
  EXPECT_EQ(callCount(outcome, "CMPIInstanceFT", "setPropertyFilter"), 0u);
  EXPECT_EQ(traces(outcome), traces(plain));
  const std::string list = referencesList(std::string("CIM_Nothing"), std::string("Nobody"), "PTR");
  expectLines({entering(kReferences, kFile, list), exiting(kReferences, kFile, list)});
  // The resolution is asked with the association's own class and no result class.
  const std::string asked =
      " broker=PTR ref=PTR _RefLeftClass=KESTA_BlueLightElementCapabilities _RefRightClass=";
  EXPECT_EQ(
      targetResolutionEntries(),
      (std::vector<std::string>{entering("get_assoc_targetClass_ObjectPath", kFactoryFile, asked),
                                entering("get_assoc_targetClass_Name", kFactoryFile, asked)}));
}

TEST_F(ElementCapabilitiesAssociationTest, ReferencesOnlyTraceAPropertyListWithANullEntry) {
  useTree({blueLight("1")});
  const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
    static const char* list[] = {nullptr, "ManagedElement", nullptr};
    return mi()->ft->references(mi(), request.context(), request.result(),
                                request.objectPath(lightPath("Blue Light:1")), nullptr, nullptr,
                                list);
  });
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(outcome.instances()[0].propertyCount(), 2u);
  EXPECT_EQ(outcome.doneCount, 0u);
  const std::string list = referencesList(std::nullopt, std::nullopt, "PTR");
  expectLines({entering(kReferences, kFile, list), exiting(kReferences, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferencesFromTheCapabilitiesWithoutLightsEndEarly) {
  const Outcome outcome = references(capabilitiesPath());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToLights, kNoLightsTrace}));
  expectLines({entering(kReferences, kFile, referencesList(std::nullopt, std::nullopt, "0"))});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferencesHandOverAnInstanceTheBrokerCouldNotMake) {
  useTree({blueLight("1"), blueLight("2")});
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome outcome = references(capabilitiesPath());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.results.size(), 2u);
  EXPECT_EQ(outcome.results[0].kind, ResultKind::Instance);
  EXPECT_EQ(outcome.results[0].state, ObjectState::NullPointer);
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(*outcome.instances()[0].find("ManagedElement"), Value(lightRef("Blue Light:2")));
  EXPECT_EQ(outcome.doneCount, 0u);
  const std::string list = referencesList(std::nullopt, std::nullopt, "0");
  expectLines({entering(kReferences, kFile, list), exiting(kReferences, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferencesReturnTheStatusTheBrokerLeft) {
  useTree({blueLight("1")});
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewInstance, 1,
                                      StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "refused")));
  const Outcome outcome = references(capabilitiesPath());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "refused"));
  ASSERT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.results[0].state, ObjectState::NullPointer);
  EXPECT_EQ(outcome.doneCount, 0u);
  const std::string list = referencesList(std::nullopt, std::nullopt, "0");
  expectLines({entering(kReferences, kFile, list), exiting(kReferences, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferencesWithoutAnAssociationPathStillEndNormally) {
  useTree({blueLight("1")});
  // The target path, then the shared association path.
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 2));
  const Outcome outcome = references(capabilitiesPath());
  // The broker refuses to make an instance on a NULL path and says so in the status, which the
  // operation returns as it stands.
  EXPECT_EQ(outcome.status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.count(ResultKind::Instance), 1u);
  EXPECT_TRUE(outcome.instances().empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  const std::string list = referencesList(std::nullopt, std::nullopt, "0");
  expectLines({entering(kReferences, kFile, list), exiting(kReferences, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferenceNamesFromTheCapabilitiesNameEveryPair) {
  useTree({blueLight("2"), blueLight("1")});
  const ObjectPathValue source = capabilitiesPath("root/other");
  const Outcome outcome = referenceNames(source, std::string("CIM_Nothing"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.paths(),
            (std::vector<ObjectPathValue>{
                referenceName(lightRef("Blue Light:1", "root/other"), source, "root/other"),
                referenceName(lightRef("Blue Light:2", "root/other"), source, "root/other")}));
  EXPECT_EQ(outcome.results.size(), 2u);
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kToLights});
  const std::string list = referenceNamesList(std::string("CIM_Nothing"), std::nullopt);
  expectLines({entering(kReferenceNames, kFile, list), exiting(kReferenceNames, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferenceNamesFromALightNameItsOnePair) {
  useTree({blueLight("1"), blueLight("2")});
  const ObjectPathValue source = lightPath("Blue Light:1");
  const Outcome outcome = referenceNames(source);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.paths(),
            std::vector<ObjectPathValue>{referenceName(source, capabilitiesRef())});
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), std::vector<std::string>{kToCapabilities});
}

TEST_F(ElementCapabilitiesAssociationTest, ReferenceNamesHandOverNothingUsableForAMissingInstance) {
  useTree({blueLight("1")});
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome outcome = referenceNames(capabilitiesPath());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.results[0].kind, ResultKind::ObjectPath);
  EXPECT_EQ(outcome.results[0].state, ObjectState::NullPointer);
  EXPECT_EQ(outcome.doneCount, 0u);
  const std::string list = referenceNamesList(std::nullopt, std::nullopt);
  expectLines({entering(kReferenceNames, kFile, list), exiting(kReferenceNames, kFile, list)});
}

TEST_F(ElementCapabilitiesAssociationTest, NoOperationCallsDoneOnAnyPath) {
  useTree({blueLight("1")});
  const ObjectPathValue light = lightPath("Blue Light:1");
  const ObjectPathValue nowhere = computerSystemPath(kSystemName);
  const std::vector<Outcome> outcomes = {
      associators(light, kAssocClass),
      associators(nowhere, kAssocClass),
      associatorNames(light, kAssocClass),
      associatorNames(nowhere, kAssocClass),
      references(light),
      references(nowhere),
      referenceNames(light),
      referenceNames(nowhere),
  };
  for (const Outcome& outcome : outcomes) {
    EXPECT_EQ(outcome.doneCount, 0u);
    EXPECT_EQ(outcome.count(ResultKind::Done), 0u);
  }
}

}  // namespace
