// KESTA_BlueLightSystemDevice, association side, through the loaded library: Associators,
// AssociatorNames, References and ReferenceNames between the lights and the computer systems that
// the host's up-calls answer, including the null association class that object managers pass.
#include <functional>
#include <string>
#include <vector>

#include "BlackboxFixture.h"

namespace {

using blackbox::callText;
using blackbox::callTexts;
using blackbox::entering;
using blackbox::exiting;
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

const std::string kCategory = "Varnel.BlueLightSystemDeviceProvider";
const std::string kFactoryCategory = "Varnel.BlueLightObjFactory";
const std::string kFile = "BlueLightSystemDeviceProvider.cpp";
const std::string kAssocClass = "KESTA_BlueLightSystemDevice";
const std::string kLight1 = "Blue Light:1.1";
const std::string kLight2 = "Blue Light:1.2";
const std::string kUpcallFailedLine =
    "MESSAGE [File: BlueLightSystemDeviceProvider.cpp, Line: N]: Call to CBEnumInstances of "
    "target Class Failed.";
const std::string kToSystemsTrace =
    "1 BlueLightSystemDeviceProvider: Target Class is ComputerSystemClass";
const std::string kToLightsTrace =
    "1 BlueLightSystemDeviceProvider: Target Class is BlueLightClass";

// A parameter list as the operations write it: the text arguments in order, the list ending at
// the first null one (the stream then fails and writes nothing more).
std::string listOf(const std::vector<std::pair<std::string, OptionalText>>& texts,
                   const std::string& tail) {
  std::string list = " mi=PTR ctx=PTR result=PTR ref=PTR";
  for (const auto& [key, text] : texts) {
    list += " " + key + "=";
    if (!text) return list;
    list += *text;
  }
  return list + tail;
}

std::string propertiesTail(const PropertyList& properties, const std::string& key) {
  return " " + key + "=" + (properties ? "PTR" : "0");
}

std::string associatorsList(const OptionalText& assocClass, const OptionalText& resultClass,
                            const OptionalText& role, const OptionalText& resultRole,
                            const PropertyList& properties) {
  return listOf({{"_RefLeftClass", assocClass},
                 {"_RefRightClass", resultClass},
                 {"role", role},
                 {"resultRole", resultRole}},
                propertiesTail(properties, "properties"));
}

std::string associatorNamesList(const OptionalText& assocClass, const OptionalText& resultClass,
                                const OptionalText& role, const OptionalText& resultRole) {
  return listOf({{"_RefLeftClass", assocClass},
                 {"_RefRightClass", resultClass},
                 {"role", role},
                 {"resultRole", resultRole}},
                "");
}

std::string referencesList(const OptionalText& resultClass, const OptionalText& role,
                           const PropertyList& properties, const std::string& propertiesKey) {
  return listOf({{"resultClass", resultClass}, {"role", role}},
                propertiesTail(properties, propertiesKey));
}

std::string referenceNamesList(const OptionalText& resultClass, const OptionalText& role) {
  return listOf({{"resultClass", resultClass}, {"role", role}}, "");
}

// The name of a computer system or the DeviceID of a light, from its path.
std::string nameOf(const ObjectPathValue& path) {
  if (const Value* name = path.findKey("Name")) return name->asString();
  if (const Value* id = path.findKey("DeviceID")) return id->asString();
  return "?" + path.toString();
}

std::vector<std::string> namesOf(const std::vector<ObjectPathValue>& paths) {
  std::vector<std::string> names;
  names.reserve(paths.size());
  for (const ObjectPathValue& path : paths) names.push_back(nameOf(path));
  return names;
}

std::vector<std::string> namesOf(const std::vector<InstanceValue>& instances) {
  std::vector<std::string> names;
  names.reserve(instances.size());
  for (const InstanceValue& instance : instances) names.push_back(nameOf(instance.path()));
  return names;
}

// "system -> light" for one association.
std::string pairOf(const Value* group, const Value* part) {
  return (group != nullptr ? nameOf(group->asReference()) : std::string("(none)")) + " -> " +
         (part != nullptr ? nameOf(part->asReference()) : std::string("(none)"));
}

// What was handed over, without the request it was handed over in.
std::vector<std::string> handedOver(const Outcome& outcome) {
  std::vector<std::string> texts;
  for (const cmpihost::ResultEvent& event : outcome.results) {
    texts.push_back(std::string(cmpihost::toString(event.kind)) + " " +
                    cmpihost::toString(event.state) + " " + event.value.toString());
  }
  return texts;
}

bool hasCall(const Outcome& outcome, const std::string& text) {
  for (const cmpihost::CallRecord& call : outcome.calls) {
    if (callText(call) == text) return true;
  }
  return false;
}

// The position (1-based) among the calls of `function` of the occurrence-th call whose text is
// `text`; 0 when there is none. Used to aim a fault at one call site.
std::uint64_t nthCall(const Outcome& outcome, const std::string& function, const std::string& text,
                      std::uint64_t occurrence = 1) {
  std::uint64_t index = 0;
  for (const cmpihost::CallRecord& call : outcome.calls) {
    if (call.function != function) continue;
    ++index;
    if (callText(call) == text && --occurrence == 0) return index;
  }
  return 0;
}

class SystemDeviceAssociationTest : public blackbox::BlackboxTest {
 protected:
  SystemDeviceAssociationTest() : mi_(associationMI(blackbox::kSystemDeviceProvider)) {
    useTree({blueLight("1.1"), blueLight("1.2")});
    useComputerSystems({"cs1", "cs2"});
  }

  Outcome associators(const ObjectPathValue& from, const OptionalText& assocClass = kAssocClass,
                      const OptionalText& resultClass = std::nullopt,
                      const OptionalText& role = std::nullopt,
                      const OptionalText& resultRole = std::nullopt,
                      const PropertyList& properties = std::nullopt) {
    return cmpihost::associators(broker_, mi_, from, assocClass, resultClass, role, resultRole,
                                 properties);
  }
  Outcome associatorNames(const ObjectPathValue& from, const OptionalText& assocClass = kAssocClass,
                          const OptionalText& resultClass = std::nullopt,
                          const OptionalText& role = std::nullopt,
                          const OptionalText& resultRole = std::nullopt) {
    return cmpihost::associatorNames(broker_, mi_, from, assocClass, resultClass, role, resultRole);
  }
  Outcome references(const ObjectPathValue& from, const OptionalText& resultClass = std::nullopt,
                     const OptionalText& role = std::nullopt,
                     const PropertyList& properties = std::nullopt) {
    return cmpihost::references(broker_, mi_, from, resultClass, role, properties);
  }
  Outcome referenceNames(const ObjectPathValue& from,
                         const OptionalText& resultClass = std::nullopt,
                         const OptionalText& role = std::nullopt) {
    return cmpihost::referenceNames(broker_, mi_, from, resultClass, role);
  }

  std::vector<std::string> providerLog() const { return log(kCategory); }

  std::vector<std::string> levelsOf(const std::string& text) const {
    std::vector<std::string> levels;
    for (const testsupport::LogLine& line : logLines()) {
      if (line.category == kCategory && line.text.find(text) != std::string::npos) {
        levels.push_back(line.kind + " " + std::to_string(line.level));
      }
    }
    return levels;
  }

  void expectTraceCopy() const { EXPECT_EQ(log(kCategory, "TRACE"), providerLog()); }

  // The light whose path the object manager passes in.
  static ObjectPathValue light(const std::string& nameSpace = blackbox::kNameSpace) {
    ObjectPathValue path = lightPath(kLight1, nameSpace);
    path.setHost("bbhost.example");
    return path;
  }

  // A computer system as the host's up-calls answer it.
  static InstanceValue computerSystem(const std::string& name) {
    InstanceValue system(computerSystemPath(name));
    system.set("CreationClassName", Value("KESTA_ComputerSystem"));
    system.set("Name", Value(name));
    return system;
  }

  // The path of a light as the provider makes it.
  static ObjectPathValue lightRef(const std::string& deviceID) {
    ObjectPathValue path = lightPath(deviceID);
    path.setHost("bbhost.example");
    return path;
  }

  CMPIAssociationMI* mi_;
};

// ---- Associators --------------------------------------------------------------------------

TEST_F(SystemDeviceAssociationTest, AssociatorsFromALightGiveEveryComputerSystem) {
  const Outcome outcome = associators(light());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> found = outcome.instances();
  EXPECT_EQ(namesOf(found), (std::vector<std::string>{"cs1", "cs2"}));
  // Unchanged, as the object manager gave them.
  ASSERT_EQ(found.size(), 2u);
  EXPECT_EQ(found[0].path(), computerSystemPath("cs1"));
  EXPECT_EQ(found[0].find("CreationClassName")->asString(), "KESTA_ComputerSystem");
  EXPECT_EQ(outcome.results.size(), 2u);
  EXPECT_EQ(outcome.doneCount, 0u);
  // Asked with the target path: the request's namespace, this host, no keys, no property list.
  EXPECT_EQ(callTexts(outcome, "enumerateInstances"),
            std::vector<std::string>{"CMPIBrokerFT.enumerateInstances(context, "
                                     "//bbhost.example/root/cimv2:KESTA_ComputerSystem, NULL)"});
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToSystemsTrace}));
  const std::string list =
      associatorsList(kAssocClass, std::nullopt, std::nullopt, std::nullopt, std::nullopt);
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{entering("BlueLightSystemDevice_Associators", kFile, list),
                                      exiting("BlueLightSystemDevice_Associators", kFile, list)}));
  expectTraceCopy();
}

TEST_F(SystemDeviceAssociationTest, AssociatorsFromAComputerSystemGiveEveryLight) {
  const Outcome outcome = associators(computerSystemPath("cs2"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> found = outcome.instances();
  EXPECT_EQ(namesOf(found), (std::vector<std::string>{kLight1, kLight2}));
  for (const InstanceValue& instance : found) {
    EXPECT_EQ(instance.className(), "KESTA_BlueLight");
    EXPECT_EQ(instance.path().nameSpace(), "root/cimv2");
  }
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToLightsTrace}));
}

TEST_F(SystemDeviceAssociationTest, AssociatorsAcceptTheResultClassesInAnyLetterCase) {
  for (const char* resultClass :
       {"KESTA_BlueLight", "kesta_bluelight", "CIM_AlarmDevice", "cim_ALARMdevice"}) {
    SCOPED_TRACE(resultClass);
    clearLog();
    const Outcome outcome =
        associators(computerSystemPath("cs1"), kAssocClass, std::string(resultClass));
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(namesOf(outcome.instances()), (std::vector<std::string>{kLight1, kLight2}));
    EXPECT_EQ(providerLog().size(), 2u);
  }
  for (const char* resultClass :
       {"KESTA_ComputerSystem", "CIM_ComputerSystem", "cim_computersystem"}) {
    SCOPED_TRACE(resultClass);
    clearLog();
    const Outcome outcome = associators(light(), kAssocClass, std::string(resultClass));
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(namesOf(outcome.instances()), (std::vector<std::string>{"cs1", "cs2"}));
    EXPECT_EQ(providerLog().size(), 2u);
  }
}

TEST_F(SystemDeviceAssociationTest, AssociatorsWithAnotherResultClassEndSilently) {
  struct Case {
    ObjectPathValue from;
    std::string resultClass;
  };
  for (const Case& c :
       {Case{computerSystemPath("cs1"), "CIM_ManagedElement"},
        Case{computerSystemPath("cs1"), "CIM_ComputerSystem"}, Case{light(), "CIM_AlarmDevice"},
        Case{light(), "KESTA_ComputerSystemX"}, Case{light(), ""}}) {
    SCOPED_TRACE(c.from.className() + " / " + c.resultClass);
    clearLog();
    const Outcome outcome = associators(c.from, kAssocClass, c.resultClass);
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(outcome.traces.size(), 1u);  // only the target choice
    EXPECT_FALSE(hasCall(outcome,
                         "CMPIBrokerFT.enumerateInstances(context, root/cimv2:"
                         "KESTA_ComputerSystem, NULL)"));
    const std::string list =
        associatorsList(kAssocClass, c.resultClass, std::nullopt, std::nullopt, std::nullopt);
    EXPECT_EQ(
        providerLog(),
        (std::vector<std::string>{entering("BlueLightSystemDevice_Associators", kFile, list)}));
  }
}

TEST_F(SystemDeviceAssociationTest, AssociatorsWithoutATargetEndSilentlyWithSuccess) {
  struct Case {
    ObjectPathValue from;
    OptionalText assocClass;
  };
  for (const Case& c :
       {Case{capabilitiesPath(), kAssocClass}, Case{classPath("CIM_ComputerSystem"), kAssocClass},
        Case{light(), std::string("kesta_bluelightsystemdevice")},
        Case{computerSystemPath("cs1"), std::string("KESTA_BlueLightElementCapabilities")},
        Case{light(), std::string("CIM_SystemDevice")}}) {
    SCOPED_TRACE(c.from.className() + " / " + c.assocClass.value_or("(null)"));
    clearLog();
    const Outcome outcome = associators(c.from, c.assocClass);
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_TRUE(outcome.traces.empty());
    const std::string list =
        associatorsList(c.assocClass, std::nullopt, std::nullopt, std::nullopt, std::nullopt);
    EXPECT_EQ(
        providerLog(),
        (std::vector<std::string>{entering("BlueLightSystemDevice_Associators", kFile, list)}));
  }
}

// The target chooser also knows the other association: a light with that association class
// leads to the capabilities class, which this provider does not return.
TEST_F(SystemDeviceAssociationTest, AssociatorsTowardsACapabilitiesTargetGiveNothing) {
  const std::string assocClass = "KESTA_BlueLightElementCapabilities";
  const Outcome outcome = associators(light(), assocClass);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{"1 BlueLightElementCapabilitiesProvider: Target Class is "
                                      "BlueLightCapabilitiesClass"}));
  const std::string list =
      associatorsList(assocClass, std::nullopt, std::nullopt, std::nullopt, std::nullopt);
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{entering("BlueLightSystemDevice_Associators", kFile, list),
                                      exiting("BlueLightSystemDevice_Associators", kFile, list)}));
}

TEST_F(SystemDeviceAssociationTest, AssociatorsReturnTheStatusOfAFailingUpcall) {
  broker_.setUpcallFailure("KESTA_ComputerSystem",
                           StatusValue(CMPI_RC_ERR_ACCESS_DENIED, std::string("refused")));
  const Outcome outcome = associators(light());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_ACCESS_DENIED, std::string("refused")));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToSystemsTrace}));
  const std::string list =
      associatorsList(kAssocClass, std::nullopt, std::nullopt, std::nullopt, std::nullopt);
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{entering("BlueLightSystemDevice_Associators", kFile, list),
                                      kUpcallFailedLine}));
  EXPECT_EQ(levelsOf("Call to CBEnumInstances"),
            (std::vector<std::string>{"LOG 6000", "TRACE 6000"}));
  expectTraceCopy();
}

TEST_F(SystemDeviceAssociationTest, OneComputerSystemIsTheOnlyOtherEndOfALight) {
  useComputerSystems({"bbhost.example"});
  EXPECT_EQ(namesOf(associators(light()).instances()),
            (std::vector<std::string>{"bbhost.example"}));
  EXPECT_EQ(associatorNames(light()).paths(),
            (std::vector<ObjectPathValue>{computerSystemPath("bbhost.example")}));
  const Outcome outcome = references(light());
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(pairOf(outcome.instances()[0].find("GroupComponent"),
                   outcome.instances()[0].find("PartComponent")),
            "bbhost.example -> " + kLight1);
  EXPECT_EQ(referenceNames(light()).paths().size(), 1u);
  // From the computer system the lights do not depend on how many systems there are.
  EXPECT_EQ(namesOf(associators(computerSystemPath("bbhost.example")).instances()),
            (std::vector<std::string>{kLight1, kLight2}));
}

TEST_F(SystemDeviceAssociationTest, AssociatorsWithoutComputerSystemsGiveNothing) {
  useComputerSystems({});
  const Outcome outcome = associators(light());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(providerLog().size(), 2u);
}

// Without lights the instance walk of the factory succeeds empty while its path walk reports
// "nothing found": Associators ends normally, AssociatorNames without its exit line.
TEST_F(SystemDeviceAssociationTest, AssociatorsWithoutLightsGiveNothing) {
  useTree({});
  const Outcome outcome = associators(computerSystemPath("cs1"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToLightsTrace}));
  const std::string list =
      associatorsList(kAssocClass, std::nullopt, std::nullopt, std::nullopt, std::nullopt);
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{entering("BlueLightSystemDevice_Associators", kFile, list),
                                      exiting("BlueLightSystemDevice_Associators", kFile, list)}));
}

TEST_F(SystemDeviceAssociationTest, AssociatorNamesWithoutLightsEndWithTheFactoryStatus) {
  useTree({});
  const Outcome outcome = associatorNames(computerSystemPath("cs1"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{kToLightsTrace,
                                      "1 BlueLightProfileProvider: ***No instance found***"}));
  const std::string list =
      associatorNamesList(kAssocClass, std::nullopt, std::nullopt, std::nullopt);
  EXPECT_EQ(
      providerLog(),
      (std::vector<std::string>{entering("BlueLightSystemDevice_AssociatorNames", kFile, list)}));
}

TEST_F(SystemDeviceAssociationTest, AssociatorsPassThePropertyListToTheLights) {
  const PropertyList properties = std::vector<std::string>{"ElementName"};
  const Outcome outcome = associators(computerSystemPath("cs1"), kAssocClass, std::nullopt,
                                      std::string("Group"), std::string("Part"), properties);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.instances().size(), 2u);
  for (const InstanceValue& instance : outcome.instances()) {
    EXPECT_TRUE(instance.has("ElementName"));
    EXPECT_FALSE(instance.has("Caption"));
  }
  // A null result class stops the traced list.
  const std::string list = associatorsList(kAssocClass, std::nullopt, std::string("Group"),
                                           std::string("Part"), properties);
  EXPECT_EQ(providerLog().front(), entering("BlueLightSystemDevice_Associators", kFile, list));
}

TEST_F(SystemDeviceAssociationTest, AssociatorsTraceEveryArgumentWhenNoneIsNull) {
  const PropertyList properties = std::vector<std::string>{};
  const Outcome outcome =
      associators(computerSystemPath("cs1"), kAssocClass, std::string("CIM_AlarmDevice"),
                  std::string("GroupComponent"), std::string("PartComponent"), properties);
  EXPECT_EQ(outcome.instances().size(), 2u);
  EXPECT_EQ(providerLog().front(),
            entering("BlueLightSystemDevice_Associators", kFile,
                     " mi=PTR ctx=PTR result=PTR ref=PTR _RefLeftClass=KESTA_BlueLightSystemDevice"
                     " _RefRightClass=CIM_AlarmDevice role=GroupComponent"
                     " resultRole=PartComponent properties=PTR"));
}

TEST_F(SystemDeviceAssociationTest, AssociatorsLeaveTheComputerSystemsUnfilteredByTheLight) {
  const Outcome outcome = associators(lightPath("Blue Light:9.9"));
  EXPECT_EQ(namesOf(outcome.instances()), (std::vector<std::string>{"cs1", "cs2"}));
}

// No target path because the broker could not make it, or it lost its handle.
TEST_F(SystemDeviceAssociationTest, AssociatorsWithoutATargetPathEndSilently) {
  for (const Fault& fault : {Fault::nullResult(CreatingFunction::NewObjectPath, 1),
                             Fault::nullHandle(CreatingFunction::NewObjectPath, 1),
                             Fault::invalidateHandle(ObjectFunction::pathSetHostname(), 1)}) {
    SCOPED_TRACE(::testing::PrintToString(fault.kind));
    for (bool names : {false, true}) {
      broker_.clearFaults();
      broker_.armFault(fault);
      clearLog();
      const Outcome outcome = names ? associatorNames(light()) : associators(light());
      EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
      EXPECT_TRUE(outcome.results.empty());
      EXPECT_EQ(providerLog().size(), 1u);
      EXPECT_FALSE(hasCall(outcome,
                           "CMPIBrokerFT.enumerateInstances(context, root/cimv2:"
                           "KESTA_ComputerSystem, NULL)"));
    }
  }
}

TEST_F(SystemDeviceAssociationTest, AssociatorNamesReturnTheFactoryStatusWhenALightCannotBeMade) {
  const std::uint64_t nth =
      nthCall(associatorNames(computerSystemPath("cs1")), "newObjectPath",
              "CMPIBrokerEncFT.newObjectPath(root/cimv2, KESTA_BlueLight)", 2);
  ASSERT_EQ(nth, 2u);  // the first is the target path, the second the first light
  for (const Fault& fault : {Fault::nullResult(CreatingFunction::NewObjectPath, nth),
                             Fault::nullHandle(CreatingFunction::NewObjectPath, nth)}) {
    SCOPED_TRACE(::testing::PrintToString(fault.kind));
    broker_.clearFaults();
    broker_.armFault(fault);
    clearLog();
    const Outcome outcome = associatorNames(computerSystemPath("cs1"));
    EXPECT_EQ(outcome.status,
              StatusValue(CMPI_RC_ERR_FAILED, std::string("Create CMPIObjectPath failed.")));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(providerLog().size(), 1u);
  }
}

// ---- AssociatorNames ----------------------------------------------------------------------

TEST_F(SystemDeviceAssociationTest, AssociatorNamesFromALightGiveEveryComputerSystemPath) {
  const Outcome outcome = associatorNames(light(), kAssocClass, std::string("CIM_ComputerSystem"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.paths(),
            (std::vector<ObjectPathValue>{computerSystemPath("cs1"), computerSystemPath("cs2")}));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(callTexts(outcome, "enumerateInstanceNames"),
            std::vector<std::string>{"CMPIBrokerFT.enumerateInstanceNames(context, "
                                     "//bbhost.example/root/cimv2:KESTA_ComputerSystem)"});
  const std::string list = associatorNamesList(kAssocClass, std::string("CIM_ComputerSystem"),
                                               std::nullopt, std::nullopt);
  EXPECT_EQ(providerLog(), (std::vector<std::string>{
                               entering("BlueLightSystemDevice_AssociatorNames", kFile, list),
                               exiting("BlueLightSystemDevice_AssociatorNames", kFile, list)}));
  expectTraceCopy();
}

TEST_F(SystemDeviceAssociationTest, AssociatorNamesFromAComputerSystemGiveTheLightsInItsNamespace) {
  const Outcome outcome = associatorNames(computerSystemPath("cs1", "root/interop"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(namesOf(outcome.paths()), (std::vector<std::string>{kLight1, kLight2}));
  for (const ObjectPathValue& path : outcome.paths()) {
    EXPECT_EQ(path.className(), "KESTA_BlueLight");
    EXPECT_EQ(path.nameSpace(), "root/interop");
    EXPECT_EQ(path.host(), "bbhost.example");
  }
  EXPECT_EQ(outcome.doneCount, 0u);
}

TEST_F(SystemDeviceAssociationTest, AssociatorNamesWithAnotherResultClassEndSilently) {
  const Outcome outcome = associatorNames(light(), kAssocClass, std::string("KESTA_BlueLight"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(providerLog().size(), 1u);
}

TEST_F(SystemDeviceAssociationTest, AssociatorNamesReportAFailingUpcallWithTheSameText) {
  broker_.setUpcallFailure("KESTA_ComputerSystem", StatusValue(CMPI_RC_ERR_NOT_FOUND));
  const Outcome outcome = associatorNames(light());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_NOT_FOUND));
  EXPECT_TRUE(outcome.results.empty());
  const std::string list =
      associatorNamesList(kAssocClass, std::nullopt, std::nullopt, std::nullopt);
  EXPECT_EQ(providerLog(), (std::vector<std::string>{
                               entering("BlueLightSystemDevice_AssociatorNames", kFile, list),
                               kUpcallFailedLine}));
  EXPECT_EQ(levelsOf("Call to CBEnumInstances"),
            (std::vector<std::string>{"LOG 6000", "TRACE 6000"}));
}

TEST_F(SystemDeviceAssociationTest, AssociatorNamesFromTheCapabilitiesEndSilently) {
  const Outcome outcome = associatorNames(capabilitiesPath());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_TRUE(outcome.traces.empty());
  EXPECT_EQ(providerLog().size(), 1u);
}

// ---- A null association class -------------------------------------------------------------

// The entry and exit lines with a null association class: the list stops after its key.
const std::string kNullClassList = " mi=PTR ctx=PTR result=PTR ref=PTR _RefLeftClass=";
// The target chooser is asked with this association's own class and no result class.
const std::string kAskedWithOwnClass =
    " broker=PTR ref=PTR _RefLeftClass=KESTA_BlueLightSystemDevice _RefRightClass=";

// Every entry and exit line of the factory's target resolution, in order.
std::vector<std::string> targetResolutionLines(const std::vector<std::string>& factoryLog) {
  std::vector<std::string> lines;
  for (const std::string& line : factoryLog) {
    if (line.rfind("ENTERING: get_assoc_targetClass_", 0) == 0 ||
        line.rfind("EXITING: get_assoc_targetClass_", 0) == 0) {
      lines.push_back(line);
    }
  }
  return lines;
}

// Object managers pass no association class when the client named none; the provider answers as
// for its own association, and traces the argument as it came. From the capabilities record, not
// an end, the answer is the same nothing as with the class named, but the unnamed request is
// logged as any operation that found nothing, with its exit line.
TEST_F(SystemDeviceAssociationTest, NullAssociationClassGivesTheOwnAnswersAndAlwaysLogsTheExit) {
  struct Case {
    std::string name;
    ObjectPathValue from;
  };
  for (const Case& c : {Case{"light", light()}, Case{"computer system", computerSystemPath("cs2")},
                        Case{"capabilities", capabilitiesPath()}}) {
    SCOPED_TRACE(c.name);
    clearLog();
    const Outcome named = associators(c.from, kAssocClass);
    const std::string namedList =
        associatorsList(kAssocClass, std::nullopt, std::nullopt, std::nullopt, std::nullopt);
    std::vector<std::string> namedExpected = {
        entering("BlueLightSystemDevice_Associators", kFile, namedList)};
    if (c.name != "capabilities") {
      namedExpected.push_back(exiting("BlueLightSystemDevice_Associators", kFile, namedList));
    }
    EXPECT_EQ(providerLog(), namedExpected);
    clearLog();
    const Outcome unnamed = associators(c.from, std::nullopt);
    EXPECT_EQ(unnamed.status, named.status);
    EXPECT_EQ(handedOver(unnamed), handedOver(named));
    EXPECT_EQ(traces(unnamed), traces(named));
    const std::string list = " mi=PTR ctx=PTR result=PTR ref=PTR _RefLeftClass=";
    std::vector<std::string> expected = {entering("BlueLightSystemDevice_Associators", kFile, list),
                                         exiting("BlueLightSystemDevice_Associators", kFile, list)};
    EXPECT_EQ(providerLog(), expected);

    clearLog();
    const Outcome namedNames = associatorNames(c.from, kAssocClass);
    const std::string namedNamesList =
        associatorNamesList(kAssocClass, std::nullopt, std::nullopt, std::nullopt);
    namedExpected = {entering("BlueLightSystemDevice_AssociatorNames", kFile, namedNamesList)};
    if (c.name != "capabilities") {
      namedExpected.push_back(
          exiting("BlueLightSystemDevice_AssociatorNames", kFile, namedNamesList));
    }
    EXPECT_EQ(providerLog(), namedExpected);
    clearLog();
    const Outcome unnamedNames = associatorNames(c.from, std::nullopt);
    EXPECT_EQ(unnamedNames.status, namedNames.status);
    EXPECT_EQ(handedOver(unnamedNames), handedOver(namedNames));
    EXPECT_EQ(traces(unnamedNames), traces(namedNames));
    expected = {entering("BlueLightSystemDevice_AssociatorNames", kFile, list),
                exiting("BlueLightSystemDevice_AssociatorNames", kFile, list)};
    EXPECT_EQ(providerLog(), expected);
  }
}

TEST_F(SystemDeviceAssociationTest, NullAssociationClassFromALightGivesTheComputerSystems) {
  const Outcome outcome = associators(light(), std::nullopt);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(namesOf(outcome.instances()), (std::vector<std::string>{"cs1", "cs2"}));
  EXPECT_EQ(outcome.instances(),
            (std::vector<InstanceValue>{computerSystem("cs1"), computerSystem("cs2")}));
  EXPECT_EQ(blackbox::handOverKinds(outcome),
            (std::vector<std::string>{"Instance Valid", "Instance Valid"}));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToSystemsTrace}));
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{
                entering("BlueLightSystemDevice_Associators", kFile, kNullClassList),
                exiting("BlueLightSystemDevice_Associators", kFile, kNullClassList)}));
  expectTraceCopy();
  // The target chooser is asked for this association by name.
  const std::vector<std::string> factory = log(kFactoryCategory);
  ASSERT_FALSE(factory.empty());
  EXPECT_NE(factory.front().find(" _RefLeftClass=KESTA_BlueLightSystemDevice _RefRightClass="),
            std::string::npos)
      << factory.front();
}

TEST_F(SystemDeviceAssociationTest, NullAssociationClassFromAComputerSystemGivesTheLightInstances) {
  const Outcome named = associators(computerSystemPath("cs1"), kAssocClass);
  clearLog();
  const Outcome outcome = associators(computerSystemPath("cs1"), std::nullopt);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.instances(), named.instances());
  std::vector<ObjectPathValue> paths;
  for (const InstanceValue& instance : outcome.instances()) {
    paths.push_back(instance.path());
    EXPECT_EQ(instance.className(), "KESTA_BlueLight");
    EXPECT_EQ(instance.propertyCount(), 15u) << instance;
  }
  EXPECT_EQ(paths, (std::vector<ObjectPathValue>{lightRef(kLight1), lightRef(kLight2)}));
  EXPECT_EQ(blackbox::handOverKinds(outcome),
            (std::vector<std::string>{"Instance Valid", "Instance Valid"}));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToLightsTrace}));
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{
                entering("BlueLightSystemDevice_Associators", kFile, kNullClassList),
                exiting("BlueLightSystemDevice_Associators", kFile, kNullClassList)}));
  expectTraceCopy();
}

TEST_F(SystemDeviceAssociationTest, NullAssociationClassNamesFromALightGiveTheComputerSystemPaths) {
  const Outcome outcome = associatorNames(light(), std::nullopt);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.paths(),
            (std::vector<ObjectPathValue>{computerSystemPath("cs1"), computerSystemPath("cs2")}));
  EXPECT_EQ(blackbox::handOverKinds(outcome),
            (std::vector<std::string>{"ObjectPath Valid", "ObjectPath Valid"}));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToSystemsTrace}));
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{
                entering("BlueLightSystemDevice_AssociatorNames", kFile, kNullClassList),
                exiting("BlueLightSystemDevice_AssociatorNames", kFile, kNullClassList)}));
  expectTraceCopy();
}

TEST_F(SystemDeviceAssociationTest, NullAssociationClassFromAComputerSystemGivesTheLights) {
  const Outcome outcome = associatorNames(computerSystemPath("cs1"), std::nullopt);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(namesOf(outcome.paths()), (std::vector<std::string>{kLight1, kLight2}));
  EXPECT_EQ(outcome.paths(), (std::vector<ObjectPathValue>{lightRef(kLight1), lightRef(kLight2)}));
  EXPECT_EQ(blackbox::handOverKinds(outcome),
            (std::vector<std::string>{"ObjectPath Valid", "ObjectPath Valid"}));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToLightsTrace}));
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{
                entering("BlueLightSystemDevice_AssociatorNames", kFile, kNullClassList),
                exiting("BlueLightSystemDevice_AssociatorNames", kFile, kNullClassList)}));
  expectTraceCopy();
}

// The capabilities record is not an end of this association: nothing, silently, with success,
// as with the association class named. Unnamed, it is a request that every association provider
// gets, and it is logged as any operation that found nothing: the entry and the exit line.
// Named, it stays as it was: the entry line only.
TEST_F(SystemDeviceAssociationTest, NullAssociationClassFromTheCapabilitiesGivesNothingAndExits) {
  for (bool names : {false, true}) {
    SCOPED_TRACE(names ? "AssociatorNames" : "Associators");
    const std::string function =
        names ? "BlueLightSystemDevice_AssociatorNames" : "BlueLightSystemDevice_Associators";
    clearLog();
    const Outcome named = names ? associatorNames(capabilitiesPath(), kAssocClass)
                                : associators(capabilitiesPath(), kAssocClass);
    EXPECT_EQ(named.status, StatusValue(CMPI_RC_OK));
    EXPECT_TRUE(named.results.empty());
    EXPECT_EQ(named.doneCount, 0u);
    EXPECT_TRUE(named.traces.empty());
    const std::string namedList =
        names
            ? associatorNamesList(kAssocClass, std::nullopt, std::nullopt, std::nullopt)
            : associatorsList(kAssocClass, std::nullopt, std::nullopt, std::nullopt, std::nullopt);
    EXPECT_EQ(providerLog(), (std::vector<std::string>{entering(function, kFile, namedList)}));

    clearLog();
    const Outcome outcome = names ? associatorNames(capabilitiesPath(), std::nullopt)
                                  : associators(capabilitiesPath(), std::nullopt);
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(outcome.doneCount, 0u);
    EXPECT_TRUE(outcome.traces.empty());
    EXPECT_EQ(providerLog(), (std::vector<std::string>{entering(function, kFile, kNullClassList),
                                                       exiting(function, kFile, kNullClassList)}));
    expectTraceCopy();
    // The target chooser is still asked with the association's own class and finds no far end.
    EXPECT_EQ(targetResolutionLines(log(kFactoryCategory)),
              (std::vector<std::string>{entering("get_assoc_targetClass_ObjectPath",
                                                 "BlueLightObjFactory.cpp", kAskedWithOwnClass),
                                        entering("get_assoc_targetClass_Name",
                                                 "BlueLightObjFactory.cpp", kAskedWithOwnClass),
                                        exiting("get_assoc_targetClass_ObjectPath",
                                                "BlueLightObjFactory.cpp", kAskedWithOwnClass)}));
  }
}

// Only the two ends, by their exact class names, start this association; every other source
// gets nothing with a null class, and the exit line.
TEST_F(SystemDeviceAssociationTest, NullAssociationClassFromAnyOtherClassGivesNothingAndExits) {
  for (const ObjectPathValue& source :
       {classPath("CIM_ComputerSystem"), ObjectPathValue("root/cimv2", "kesta_computersystem"),
        ObjectPathValue("root/cimv2", "CIM_AlarmDevice"), classPath(kAssocClass),
        capabilitiesPath("root/other")}) {
    SCOPED_TRACE(source.toString());
    for (bool names : {false, true}) {
      SCOPED_TRACE(names ? "AssociatorNames" : "Associators");
      const std::string function =
          names ? "BlueLightSystemDevice_AssociatorNames" : "BlueLightSystemDevice_Associators";
      clearLog();
      const Outcome outcome =
          names ? associatorNames(source, std::nullopt)
                : associators(source, std::nullopt, std::string("X"), std::string("Group"),
                              std::string("Part"), std::vector<std::string>{"Name"});
      EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
      EXPECT_TRUE(outcome.results.empty());
      EXPECT_EQ(outcome.doneCount, 0u);
      EXPECT_TRUE(outcome.traces.empty());
      EXPECT_EQ(providerLog(),
                (std::vector<std::string>{entering(function, kFile, kNullClassList),
                                          exiting(function, kFile, kNullClassList)}));
    }
  }
}

// From an end, a far end the broker could not make still ends silently without the exit line:
// only the source decides that there is nothing to answer.
TEST_F(SystemDeviceAssociationTest, NullAssociationClassWithoutATargetPathFromALightStaysSilent) {
  for (bool names : {false, true}) {
    SCOPED_TRACE(names ? "AssociatorNames" : "Associators");
    const std::string function =
        names ? "BlueLightSystemDevice_AssociatorNames" : "BlueLightSystemDevice_Associators";
    broker_.clearFaults();
    broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
    clearLog();
    const Outcome outcome =
        names ? associatorNames(light(), std::nullopt) : associators(light(), std::nullopt);
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(outcome.doneCount, 0u);
    EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToSystemsTrace}));
    EXPECT_EQ(providerLog(), (std::vector<std::string>{entering(function, kFile, kNullClassList)}));
  }
  broker_.clearFaults();
}

TEST_F(SystemDeviceAssociationTest, NullAssociationClassKeepsTheResultClassTest) {
  EXPECT_TRUE(associators(light(), std::nullopt, std::string("CIM_AlarmDevice")).results.empty());
  EXPECT_EQ(
      namesOf(associators(light(), std::nullopt, std::string("cim_computersystem")).instances()),
      (std::vector<std::string>{"cs1", "cs2"}));
  EXPECT_EQ(namesOf(associatorNames(computerSystemPath("cs1"), std::nullopt,
                                    std::string("CIM_AlarmDevice"))
                        .paths()),
            (std::vector<std::string>{kLight1, kLight2}));
}

TEST_F(SystemDeviceAssociationTest, NullAssociationClassWithAFailingUpcall) {
  broker_.setUpcallFailure("KESTA_ComputerSystem", StatusValue(CMPI_RC_ERR_FAILED));
  const Outcome outcome = associators(light(), std::nullopt);
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED));
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{entering("BlueLightSystemDevice_Associators", kFile,
                                               " mi=PTR ctx=PTR result=PTR ref=PTR _RefLeftClass="),
                                      kUpcallFailedLine}));
}

// ---- References ---------------------------------------------------------------------------

TEST_F(SystemDeviceAssociationTest, ReferencesFromALightGiveOneAssociationPerComputerSystem) {
  const Outcome outcome = references(light());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> found = outcome.instances();
  ASSERT_EQ(found.size(), 2u);
  std::vector<std::string> pairs;
  for (const InstanceValue& instance : found) {
    EXPECT_EQ(instance.className(), kAssocClass);
    EXPECT_EQ(instance.path().nameSpace(), "root/cimv2");
    EXPECT_EQ(instance.path().host(), "bbhost.example");
    EXPECT_EQ(instance.find("PartComponent")->asReference(), light());
    pairs.push_back(pairOf(instance.find("GroupComponent"), instance.find("PartComponent")));
  }
  EXPECT_EQ(found[1].find("GroupComponent")->asReference(), computerSystemPath("cs2"));
  EXPECT_EQ(pairs, (std::vector<std::string>{"cs1 -> " + kLight1, "cs2 -> " + kLight1}));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToSystemsTrace}));
  EXPECT_EQ(callTexts(outcome, "enumerateInstanceNames"),
            std::vector<std::string>{"CMPIBrokerFT.enumerateInstanceNames(context, "
                                     "//bbhost.example/root/cimv2:KESTA_ComputerSystem)"});
  EXPECT_EQ(
      providerLog(),
      (std::vector<std::string>{
          entering("BlueLightSystemDevice_References", kFile,
                   referencesList(std::nullopt, std::nullopt, std::nullopt, "properties")),
          exiting("BlueLightSystemDevice_References", kFile,
                  referencesList(std::nullopt, std::nullopt, std::nullopt, "p     roperties"))}));
  expectTraceCopy();
}

TEST_F(SystemDeviceAssociationTest, ReferencesWriteTheOddPropertiesKeyOnlyOnExit) {
  const PropertyList properties = std::vector<std::string>{"GroupComponent"};
  const Outcome outcome = references(light(), std::string("KESTA_BlueLightSystemDevice"),
                                     std::string("Part"), properties);
  EXPECT_EQ(outcome.instances().size(), 2u);
  EXPECT_EQ(
      providerLog(),
      (std::vector<std::string>{
          entering("BlueLightSystemDevice_References", kFile,
                   " mi=PTR ctx=PTR result=PTR ref=PTR resultClass=KESTA_BlueLightSystemDevice"
                   " role=Part properties=PTR"),
          exiting("BlueLightSystemDevice_References", kFile,
                  " mi=PTR ctx=PTR result=PTR ref=PTR resultClass=KESTA_BlueLightSystemDevice"
                  " role=Part p     roperties=PTR")}));
}

TEST_F(SystemDeviceAssociationTest, ReferencesFromAComputerSystemGiveOneAssociationPerLight) {
  const Outcome outcome = references(computerSystemPath("cs2"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  std::vector<std::string> pairs;
  for (const InstanceValue& instance : outcome.instances()) {
    EXPECT_EQ(instance.find("GroupComponent")->asReference(), computerSystemPath("cs2"));
    pairs.push_back(pairOf(instance.find("GroupComponent"), instance.find("PartComponent")));
  }
  EXPECT_EQ(pairs, (std::vector<std::string>{"cs2 -> " + kLight1, "cs2 -> " + kLight2}));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome), (std::vector<std::string>{kToLightsTrace}));
}

TEST_F(SystemDeviceAssociationTest, ReferencesIgnoreTheResultClassAndPropertyList) {
  const Outcome plain = references(light());
  for (const OptionalText& resultClass :
       {OptionalText(std::string("CIM_Nothing")), OptionalText(std::string("")),
        OptionalText(std::nullopt)}) {
    const Outcome outcome =
        references(light(), resultClass, std::nullopt, std::vector<std::string>{});
    EXPECT_EQ(outcome.status, plain.status);
    EXPECT_EQ(handedOver(outcome), handedOver(plain));
  }
  for (const cmpihost::CallRecord& call : plain.calls) {
    EXPECT_NE(call.function, "setPropertyFilter") << call;
  }
}

TEST_F(SystemDeviceAssociationTest, ReferencesFromTheCapabilitiesFail) {
  const Outcome outcome = references(capabilitiesPath());
  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("Object Path is NULL in References.")));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{"2 BlueLightSystemDeviceProvider: Object Path is NULL in "
                                      "References."}));
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{
                entering("BlueLightSystemDevice_References", kFile,
                         referencesList(std::nullopt, std::nullopt, std::nullopt, "properties"))}));
}

TEST_F(SystemDeviceAssociationTest, ReferencesWithoutATargetPathFail) {
  for (const Fault& fault : {Fault::nullResult(CreatingFunction::NewObjectPath, 1),
                             Fault::nullHandle(CreatingFunction::NewObjectPath, 1),
                             Fault::invalidateHandle(ObjectFunction::pathSetHostname(), 1)}) {
    SCOPED_TRACE(::testing::PrintToString(fault.kind));
    broker_.clearFaults();
    broker_.armFault(fault);
    clearLog();
    const Outcome outcome = references(light());
    EXPECT_EQ(outcome.status,
              StatusValue(CMPI_RC_ERR_FAILED, std::string("Object Path is NULL in References.")));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(traces(outcome).back(),
              "2 BlueLightSystemDeviceProvider: Object Path is NULL in References.");
    EXPECT_EQ(providerLog().size(), 1u);

    broker_.clearFaults();
    broker_.armFault(fault);
    clearLog();
    const Outcome names = referenceNames(light());
    EXPECT_EQ(names.status, StatusValue(CMPI_RC_ERR_FAILED,
                                        std::string("Object Path is NULL in ReferenceNames.")));
    EXPECT_TRUE(names.results.empty());
    EXPECT_EQ(providerLog().size(), 1u);
  }
}

TEST_F(SystemDeviceAssociationTest, ReferencesReturnTheStatusOfAFailingUpcall) {
  broker_.setUpcallFailure("KESTA_ComputerSystem",
                           StatusValue(CMPI_RC_ERR_ACCESS_DENIED, std::string("refused")));
  for (bool names : {false, true}) {
    SCOPED_TRACE(names ? "ReferenceNames" : "References");
    clearLog();
    const Outcome outcome = names ? referenceNames(light()) : references(light());
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_ACCESS_DENIED, std::string("refused")));
    EXPECT_TRUE(outcome.results.empty());
    const std::vector<std::string> lines = providerLog();
    ASSERT_EQ(lines.size(), 2u);
    EXPECT_EQ(lines[1], kUpcallFailedLine);
    EXPECT_EQ(levelsOf("Call to CBEnumInstances"),
              (std::vector<std::string>{"LOG 6000", "TRACE 6000"}));
  }
}

TEST_F(SystemDeviceAssociationTest, ReferencesWithoutComputerSystemsGiveNothing) {
  useComputerSystems({});
  const Outcome outcome = references(light());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(providerLog().size(), 2u);
}

TEST_F(SystemDeviceAssociationTest, ReferencesWithoutLightsEndWithTheFactoryStatus) {
  useTree({});
  for (bool names : {false, true}) {
    clearLog();
    const Outcome outcome =
        names ? referenceNames(computerSystemPath("cs1")) : references(computerSystemPath("cs1"));
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(providerLog().size(), 1u);
  }
}

// An instance the broker could not make is handed over as it is; the status is what the broker
// left, and the operation ends normally.
TEST_F(SystemDeviceAssociationTest, ReferencesHandOverAnInstanceTheBrokerCouldNotMake) {
  broker_.armFault(Fault::errorStatus(CreatingFunction::NewInstance, 2,
                                      StatusValue(CMPI_RC_ERR_FAILED, std::string("no memory"))));
  const Outcome outcome = references(computerSystemPath("cs1"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, std::string("no memory")));
  ASSERT_EQ(outcome.results.size(), 2u);
  EXPECT_EQ(outcome.results[0].state, ObjectState::Valid);
  EXPECT_EQ(outcome.results[1].kind, ResultKind::Instance);
  EXPECT_EQ(outcome.results[1].state, ObjectState::NullPointer);
  EXPECT_EQ(providerLog().size(), 2u);
}

// ---- ReferenceNames -----------------------------------------------------------------------

TEST_F(SystemDeviceAssociationTest, ReferenceNamesFromALightGiveTheAssociationPaths) {
  const Outcome outcome = referenceNames(light("root/interop"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  std::vector<std::string> pairs;
  for (const ObjectPathValue& path : outcome.paths()) {
    EXPECT_EQ(path.className(), kAssocClass);
    EXPECT_EQ(path.nameSpace(), "root/interop");
    pairs.push_back(pairOf(path.findKey("GroupComponent"), path.findKey("PartComponent")));
  }
  EXPECT_EQ(pairs, (std::vector<std::string>{"cs1 -> " + kLight1, "cs2 -> " + kLight1}));
  EXPECT_EQ(outcome.doneCount, 0u);
  const std::string list = referenceNamesList(std::nullopt, std::nullopt);
  EXPECT_EQ(providerLog(), (std::vector<std::string>{
                               entering("BlueLightSystemDevice_ReferenceNames", kFile, list),
                               exiting("BlueLightSystemDevice_ReferenceNames", kFile, list)}));
  expectTraceCopy();
}

TEST_F(SystemDeviceAssociationTest, ReferenceNamesFromAComputerSystemGiveOnePathPerLight) {
  const Outcome outcome =
      referenceNames(computerSystemPath("cs1"), std::string("X"), std::string("Group"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  std::vector<std::string> pairs;
  for (const ObjectPathValue& path : outcome.paths()) {
    pairs.push_back(pairOf(path.findKey("GroupComponent"), path.findKey("PartComponent")));
  }
  EXPECT_EQ(pairs, (std::vector<std::string>{"cs1 -> " + kLight1, "cs1 -> " + kLight2}));
  EXPECT_EQ(providerLog().front(),
            entering("BlueLightSystemDevice_ReferenceNames", kFile,
                     " mi=PTR ctx=PTR result=PTR ref=PTR resultClass=X role=Group"));
}

TEST_F(SystemDeviceAssociationTest, ReferenceNamesFromTheCapabilitiesFail) {
  const Outcome outcome = referenceNames(capabilitiesPath());
  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("Object Path is NULL in ReferenceNames.")));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{"2 BlueLightSystemDeviceProvider: Object Path is NULL in "
                                      "ReferenceNames."}));
  EXPECT_EQ(providerLog().size(), 1u);
}

// ---- Robustness ---------------------------------------------------------------------------

TEST_F(SystemDeviceAssociationTest, EveryCreatingCallMayFail) {
  const std::vector<std::function<Outcome()>> operations = {
      [&] { return associators(light(), std::nullopt); },
      [&] {
        return associators(computerSystemPath("cs1"), kAssocClass, std::nullopt, std::nullopt,
                           std::nullopt, std::vector<std::string>{"Caption"});
      },
      [&] { return associatorNames(light()); },
      [&] { return associatorNames(computerSystemPath("cs1"), std::nullopt); },
      [&] { return references(light()); },
      [&] { return references(computerSystemPath("cs1")); },
      [&] { return referenceNames(light()); },
      [&] { return referenceNames(computerSystemPath("cs1")); }};
  forEveryCreatingFault(operations,
                        [](const Outcome& outcome) { EXPECT_EQ(outcome.doneCount, 0u); });
}

}  // namespace
