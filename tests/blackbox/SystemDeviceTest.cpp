// KESTA_BlueLightSystemDevice, instance side, through the loaded library: EnumInstanceNames,
// EnumInstances and GetInstance, with the computer systems answered by the host's up-calls, and
// every failure branch reached by fault injection.
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
using cmpihost::Outcome;
using cmpihost::ResultKind;
using cmpihost::StatusValue;
using cmpihost::Value;
using testsupport::blueLight;

const std::string kCategory = "Varnel.BlueLightSystemDeviceProvider";
const std::string kFile = "BlueLightSystemDeviceProvider.cpp";
const std::string kAssocClass = "KESTA_BlueLightSystemDevice";
const std::string kLight1 = "Blue Light:1.1";
const std::string kLight2 = "Blue Light:1.2";
const std::string kUpcallFailedLine =
    "MESSAGE [File: BlueLightSystemDeviceProvider.cpp, Line: N]: Call to CBEnumInstances of "
    "target Class Failed.";

const std::string kNamesList = " mi=PTR ctx=PTR result=PTR ref=PTR";
const std::string kInstancesList = " mi=PTR ctx=PTR result=PTR ref=PTR properties=0";
const std::string kGetList = " mi=PTR ctx=PTR result=PTR cop=PTR properties=0";
const std::string kBuilderList = " ref=PTR properties=0 ctx=PTR instances=PTR";

std::string namesIn() {
  return entering("BlueLightSystemDevice_EnumInstanceNames", kFile, kNamesList);
}
std::string namesOut() {
  return exiting("BlueLightSystemDevice_EnumInstanceNames", kFile, kNamesList);
}
std::string enumIn() {
  return entering("BlueLightSystemDevice_EnumInstances", kFile, kInstancesList);
}
std::string enumOut() {
  return exiting("BlueLightSystemDevice_EnumInstances", kFile, kInstancesList);
}
std::string getIn() { return entering("BlueLightSystemDevice_GetInstance", kFile, kGetList); }
std::string getOut() { return exiting("BlueLightSystemDevice_GetInstance", kFile, kGetList); }
std::string builderIn() {
  return entering("bluelightSystemDeviceCMPIInstances", kFile, kBuilderList);
}
std::string builderOut() {
  return exiting("bluelightSystemDeviceCMPIInstances", kFile, kBuilderList);
}

// "system -> light" for one association, from the two references of a path or an instance.
std::string pairOf(const Value* group, const Value* part) {
  std::string text;
  text += group != nullptr && !group->isNull() ? group->asReference().findKey("Name")->asString()
                                               : std::string("(none)");
  text += " -> ";
  text += part != nullptr && !part->isNull() ? part->asReference().findKey("DeviceID")->asString()
                                             : std::string("(none)");
  return text;
}

std::vector<std::string> pairsOf(const std::vector<ObjectPathValue>& paths) {
  std::vector<std::string> pairs;
  pairs.reserve(paths.size());
  for (const ObjectPathValue& path : paths) {
    pairs.push_back(pairOf(path.findKey("GroupComponent"), path.findKey("PartComponent")));
  }
  return pairs;
}

std::vector<std::string> pairsOf(const std::vector<InstanceValue>& instances) {
  std::vector<std::string> pairs;
  pairs.reserve(instances.size());
  for (const InstanceValue& instance : instances) {
    pairs.push_back(pairOf(instance.find("GroupComponent"), instance.find("PartComponent")));
  }
  return pairs;
}

// The position (1-based) of the call of `function` whose text is `text`, counting only calls of
// that function; 0 when there is none. Used to aim a fault at one call site.
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

bool hasCall(const Outcome& outcome, const std::string& text) {
  for (const cmpihost::CallRecord& call : outcome.calls) {
    if (callText(call) == text) return true;
  }
  return false;
}

// A result that passes everything on to the host's result and runs a callback when the provider
// calls returnDone, so that a test can see what the log held at that moment.
struct DoneProbe {
  CMPIResult self;
  const CMPIResult* inner = nullptr;
  std::function<void()> onDone;

  static DoneProbe* of(const CMPIResult* result) { return static_cast<DoneProbe*>(result->hdl); }
  static CMPIStatus release(CMPIResult*) { return {CMPI_RC_OK, nullptr}; }
  static CMPIResult* clone(const CMPIResult*, CMPIStatus* rc) {
    if (rc != nullptr) *rc = {CMPI_RC_ERR_NOT_SUPPORTED, nullptr};
    return nullptr;
  }
  static CMPIStatus returnData(const CMPIResult* r, const CMPIValue* v, const CMPIType t) {
    return of(r)->inner->ft->returnData(of(r)->inner, v, t);
  }
  static CMPIStatus returnInstance(const CMPIResult* r, const CMPIInstance* i) {
    return of(r)->inner->ft->returnInstance(of(r)->inner, i);
  }
  static CMPIStatus returnObjectPath(const CMPIResult* r, const CMPIObjectPath* p) {
    return of(r)->inner->ft->returnObjectPath(of(r)->inner, p);
  }
  static CMPIStatus returnDone(const CMPIResult* r) {
    if (of(r)->onDone) of(r)->onDone();
    return of(r)->inner->ft->returnDone(of(r)->inner);
  }
#ifdef CMPI_VER_200
  static CMPIStatus returnError(const CMPIResult* r, const CMPIError* e) {
    return of(r)->inner->ft->returnError(of(r)->inner, e);
  }
#endif

  DoneProbe() {
    static CMPIResultFT table = {CMPICurrentVersion, release,          clone,      returnData,
                                 returnInstance,     returnObjectPath, returnDone,
#ifdef CMPI_VER_200
                                 returnError
#endif
    };
    self.hdl = this;
    self.ft = &table;
  }
};

class SystemDeviceTest : public blackbox::BlackboxTest {
 protected:
  SystemDeviceTest() : mi_(instanceMI(blackbox::kSystemDeviceProvider)) {
    useTree({blueLight("1.1"), blueLight("1.2")});
  }

  Outcome names(const ObjectPathValue& path = classPath(kAssocClass)) {
    return cmpihost::enumerateInstanceNames(broker_, mi_, path);
  }
  Outcome instances(const cmpihost::PropertyList& properties = std::nullopt,
                    const ObjectPathValue& path = classPath(kAssocClass)) {
    return cmpihost::enumerateInstances(broker_, mi_, path, properties);
  }
  Outcome get(const ObjectPathValue& path,
              const cmpihost::PropertyList& properties = std::nullopt) {
    return cmpihost::getInstance(broker_, mi_, path, properties);
  }

  // The path of one association as a client sends it to GetInstance.
  static ObjectPathValue associationPath(const std::string& system, const std::string& light) {
    ObjectPathValue path(blackbox::kNameSpace, kAssocClass);
    path.addKey("GroupComponent", Value(computerSystemPath(system)));
    path.addKey("PartComponent", Value(lightPath(light)));
    return path;
  }

  std::vector<std::string> providerLog() const { return log(kCategory); }

  // The provider's log lines (log and trace copies) that carry `text`, as "<kind> <level>".
  std::vector<std::string> levelsOf(const std::string& text) const {
    std::vector<std::string> levels;
    for (const testsupport::LogLine& line : logLines()) {
      if (line.category == kCategory && line.text.find(text) != std::string::npos) {
        levels.push_back(line.kind + " " + std::to_string(line.level));
      }
    }
    return levels;
  }

  // Every log line of this unit is written once at log level and once at trace level.
  void expectTraceCopy() const { EXPECT_EQ(log(kCategory, "TRACE"), providerLog()); }

  CMPIInstanceMI* mi_;
};

// ---- EnumInstanceNames --------------------------------------------------------------------

TEST_F(SystemDeviceTest, NamesWithOneSystemGiveOneAssociationPerLight) {
  const Outcome outcome = names();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.paths().size(), 2u);
  EXPECT_EQ(pairsOf(outcome.paths()), (std::vector<std::string>{"bbhost.example -> " + kLight1,
                                                                "bbhost.example -> " + kLight2}));
  for (const ObjectPathValue& path : outcome.paths()) {
    EXPECT_EQ(path.className(), kAssocClass);
    EXPECT_EQ(path.nameSpace(), "root/cimv2");
    EXPECT_EQ(path.host(), "bbhost.example");
    ASSERT_EQ(path.keys().size(), 2u);
    EXPECT_EQ(path.keys()[0].name, "GroupComponent");
    EXPECT_EQ(path.keys()[1].name, "PartComponent");
    EXPECT_EQ(path.keys()[0].value.type(), CMPI_ref);
    EXPECT_EQ(path.keys()[1].value.type(), CMPI_ref);
    // The computer system exactly as the object manager gave it.
    EXPECT_EQ(path.keys()[0].value.asReference(), computerSystemPath("bbhost.example"));
  }
  ObjectPathValue light = lightPath(kLight1);
  light.setHost("bbhost.example");
  EXPECT_EQ(outcome.paths()[0].findKey("PartComponent")->asReference(), light);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(outcome.results.back().kind, ResultKind::Done);
  EXPECT_TRUE(outcome.traces.empty());
  EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn(), namesOut()}));
  expectTraceCopy();
}

TEST_F(SystemDeviceTest, NamesAskTheObjectManagerForComputerSystemsInTheRequestNamespace) {
  const Outcome outcome = names(classPath(kAssocClass, "root/interop"));
  EXPECT_TRUE(hasCall(outcome,
                      "CMPIBrokerFT.enumerateInstanceNames(context, root/interop:"
                      "KESTA_ComputerSystem)"))
      << ::testing::PrintToString(outcome.calls);
  ASSERT_EQ(outcome.paths().size(), 2u);
  for (const ObjectPathValue& path : outcome.paths()) {
    EXPECT_EQ(path.nameSpace(), "root/interop");
    EXPECT_EQ(path.findKey("PartComponent")->asReference().nameSpace(), "root/interop");
  }
}

// EnumInstanceNames writes its exit line before CMReturnDone; EnumInstances and GetInstance do
// the same. The probe result reads the log at the moment returnDone arrives.
TEST_F(SystemDeviceTest, EveryInstanceOperationWritesTheExitLineBeforeReturnDone) {
  struct Case {
    std::string name;
    std::function<CMPIStatus(cmpihost::Request&, const CMPIResult*)> call;
    std::vector<std::string> log;
  };
  const std::vector<Case> cases = {
      {"EnumInstanceNames",
       [&](cmpihost::Request& request, const CMPIResult* result) {
         return mi_->ft->enumerateInstanceNames(mi_, request.context(), result,
                                                request.objectPath(classPath(kAssocClass)));
       },
       {namesIn(), namesOut()}},
      {"EnumInstances",
       [&](cmpihost::Request& request, const CMPIResult* result) {
         return mi_->ft->enumerateInstances(mi_, request.context(), result,
                                            request.objectPath(classPath(kAssocClass)), nullptr);
       },
       {enumIn(), builderIn(), builderOut(), enumOut()}},
      {"GetInstance",
       [&](cmpihost::Request& request, const CMPIResult* result) {
         return mi_->ft->getInstance(mi_, request.context(), result,
                                     request.objectPath(associationPath("bbhost.example", kLight1)),
                                     nullptr);
       },
       {getIn(), builderIn(), builderOut(), getOut()}}};
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    clearLog();
    DoneProbe probe;
    std::vector<std::string> logAtDone;
    probe.onDone = [&] { logAtDone = providerLog(); };
    const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
      probe.inner = request.result();
      return c.call(request, &probe.self);
    });
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(outcome.doneCount, 1u);
    EXPECT_EQ(logAtDone, c.log);
  }
}

TEST_F(SystemDeviceTest, NamesWithTwoSystemsPairTheSecondWithTheLightsTwice) {
  useComputerSystems({"cs1", "cs2"});
  const Outcome outcome = names();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(
      pairsOf(outcome.paths()),
      (std::vector<std::string>{"cs1 -> " + kLight1, "cs1 -> " + kLight2, "cs2 -> " + kLight1,
                                "cs2 -> " + kLight2, "cs2 -> " + kLight1, "cs2 -> " + kLight2}));
  EXPECT_EQ(outcome.doneCount, 1u);
}

TEST_F(SystemDeviceTest, NamesGiveTheKthSystemKTimesTheLights) {
  useComputerSystems({"cs1", "cs2", "cs3"});
  useTree({blueLight("1.1")});
  const Outcome outcome = names();
  EXPECT_EQ(
      pairsOf(outcome.paths()),
      (std::vector<std::string>{"cs1 -> " + kLight1, "cs2 -> " + kLight1, "cs2 -> " + kLight1,
                                "cs3 -> " + kLight1, "cs3 -> " + kLight1, "cs3 -> " + kLight1}));
}

TEST_F(SystemDeviceTest, NamesWithoutComputerSystemsEndNormallyWithNothing) {
  useComputerSystems({});
  const Outcome outcome = names();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn(), namesOut()}));
}

TEST_F(SystemDeviceTest, NamesWithoutLightsEndWithoutExitLineOrDone) {
  useTree({});
  const Outcome outcome = names();
  // The empty light map stops the operation with the status as the factory left it.
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn()}));
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{"1 BlueLightProfileProvider: ***No instance found***"}));
}

TEST_F(SystemDeviceTest, NamesReturnTheStatusOfAFailingUpcall) {
  broker_.setUpcallFailure("KESTA_ComputerSystem",
                           StatusValue(CMPI_RC_ERR_ACCESS_DENIED, std::string("not for you")));
  const Outcome outcome = names();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_ACCESS_DENIED, std::string("not for you")));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_TRUE(outcome.traces.empty());
  EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn(), kUpcallFailedLine}));
  EXPECT_EQ(levelsOf("Call to CBEnumInstances"),
            (std::vector<std::string>{"LOG 6000", "TRACE 6000"}));
  EXPECT_EQ(levelsOf("ENTERING"), (std::vector<std::string>{"LOG 3000", "TRACE 3000"}));
  expectTraceCopy();
}

TEST_F(SystemDeviceTest, NamesReturnTheStatusOfAnUpcallFaultedWithAStatus) {
  broker_.armFault(Fault::errorStatus(CreatingFunction::EnumerateInstanceNames, 1,
                                      StatusValue(CMPI_RC_ERR_INVALID_NAMESPACE)));
  const Outcome outcome = names();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_INVALID_NAMESPACE));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn(), kUpcallFailedLine}));
}

TEST_F(SystemDeviceTest, NamesTreatAMissingEnumerationWithoutErrorAsNoComputerSystem) {
  broker_.armFault(Fault::nullResult(CreatingFunction::EnumerateInstanceNames));
  const Outcome outcome = names();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_TRUE(outcome.paths().empty());
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn(), namesOut()}));
}

// The names fail: the computer-system class path.
TEST_F(SystemDeviceTest, NamesFailWhenTheComputerSystemPathCannotBeMade) {
  const std::uint64_t nth = nthCall(names(), "newObjectPath",
                                    "CMPIBrokerEncFT.newObjectPath(root/cimv2, "
                                    "KESTA_ComputerSystem)");
  ASSERT_EQ(nth, 1u);
  for (const Fault& fault : {Fault::nullResult(CreatingFunction::NewObjectPath, nth),
                             Fault::nullHandle(CreatingFunction::NewObjectPath, nth)}) {
    SCOPED_TRACE(::testing::PrintToString(fault.kind));
    broker_.clearFaults();
    broker_.armFault(fault);
    clearLog();
    const Outcome outcome = names();
    EXPECT_EQ(outcome.status,
              StatusValue(CMPI_RC_ERR_FAILED, std::string("Create CMPIObjectPath failed.")));
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_EQ(outcome.doneCount, 0u);
    EXPECT_EQ(traces(outcome),
              (std::vector<std::string>{
                  "2 BlueLightSystemDeviceProvider: Create CMPIObjectPath failed for "
                  "ComputerSystemClass."}));
    EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn()}));
  }
}

// The names fail: a light path that was fine when the factory made it and lost its handle
// afterwards.
TEST_F(SystemDeviceTest, NamesFailOnALightPathWithoutHandle) {
  // Each light path gets four keys; the fourth addKey is the last call on the first light path.
  broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), 4));
  const Outcome outcome = names();
  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("CMPIObjectPath is NULL for BlueLight")));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{
                "2 BlueLightSystemDeviceProvider: CMPIObjectPath is NULL for BlueLight Class"}));
  EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn()}));
}

TEST_F(SystemDeviceTest, NamesKeepWhatWasReturnedBeforeALightPathWithoutHandle) {
  broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), 8));
  const Outcome outcome = names();
  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("CMPIObjectPath is NULL for BlueLight")));
  EXPECT_EQ(pairsOf(outcome.paths()), (std::vector<std::string>{"bbhost.example -> " + kLight1}));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn()}));
}

// The names fail: the association path.
TEST_F(SystemDeviceTest, NamesFailWhenAnAssociationPathCannotBeMade) {
  const std::string call = "CMPIBrokerEncFT.newObjectPath(root/cimv2, " + kAssocClass + ")";
  const Outcome clean = names();
  for (std::uint64_t occurrence : {1u, 2u}) {
    const std::uint64_t nth = nthCall(clean, "newObjectPath", call, occurrence);
    ASSERT_NE(nth, 0u);
    for (const Fault& fault : {Fault::nullResult(CreatingFunction::NewObjectPath, nth),
                               Fault::nullHandle(CreatingFunction::NewObjectPath, nth)}) {
      SCOPED_TRACE(::testing::PrintToString(fault.kind) + " at association " +
                   std::to_string(occurrence));
      broker_.clearFaults();
      broker_.armFault(fault);
      clearLog();
      const Outcome outcome = names();
      EXPECT_EQ(outcome.status,
                StatusValue(CMPI_RC_ERR_FAILED,
                            std::string("Create CMPIObjectPath failed                     for "
                                        "BlueLightSystemDeviceProvider.")));
      EXPECT_EQ(outcome.paths().size(), occurrence - 1);
      EXPECT_EQ(outcome.doneCount, 0u);
      EXPECT_EQ(traces(outcome),
                (std::vector<std::string>{
                    "2 BlueLightSystemDeviceProvider: Create CMPIObjectPath failed for"
                    "                     BlueLightSystemDeviceClass."}));
      EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn()}));
    }
  }
}

TEST_F(SystemDeviceTest, NamesReturnTheFactoryStatusWhenALightPathCannotBeMade) {
  const std::uint64_t nth = nthCall(names(), "newObjectPath",
                                    "CMPIBrokerEncFT.newObjectPath(root/cimv2, KESTA_BlueLight)");
  ASSERT_NE(nth, 0u);
  broker_.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, nth));
  clearLog();
  const Outcome outcome = names();
  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("Create CMPIObjectPath failed.")));
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_EQ(providerLog(), (std::vector<std::string>{namesIn()}));
}

// ---- EnumInstances ------------------------------------------------------------------------

TEST_F(SystemDeviceTest, InstancesWithOneSystemGiveOneInstancePerLight) {
  const Outcome outcome = instances();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  const std::vector<InstanceValue> found = outcome.instances();
  EXPECT_EQ(pairsOf(found), (std::vector<std::string>{"bbhost.example -> " + kLight1,
                                                      "bbhost.example -> " + kLight2}));
  for (const InstanceValue& instance : found) {
    EXPECT_EQ(instance.className(), kAssocClass);
    EXPECT_EQ(instance.path().nameSpace(), "root/cimv2");
    EXPECT_EQ(instance.path().host(), "bbhost.example");
    EXPECT_EQ(instance.propertyCount(), 2u);
    EXPECT_EQ(instance.find("GroupComponent")->asReference(), computerSystemPath("bbhost.example"));
  }
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(outcome.results.back().kind, ResultKind::Done);
  EXPECT_TRUE(outcome.traces.empty());
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{enumIn(), builderIn(), builderOut(), enumOut()}));
  expectTraceCopy();
}

TEST_F(SystemDeviceTest, InstancesWithTwoSystemsPairEachSystemWithEveryLightOnce) {
  useComputerSystems({"cs1", "cs2"});
  const Outcome outcome = instances();
  EXPECT_EQ(pairsOf(outcome.instances()),
            (std::vector<std::string>{"cs1 -> " + kLight1, "cs1 -> " + kLight2, "cs2 -> " + kLight1,
                                      "cs2 -> " + kLight2}));
}

TEST_F(SystemDeviceTest, InstancesKeepTheNamespaceOfTheComputerSystemAsGiven) {
  useComputerSystems({"cs1"});
  const Outcome outcome = instances(std::nullopt, classPath(kAssocClass, "root/interop"));
  ASSERT_EQ(outcome.instances().size(), 2u);
  for (const InstanceValue& instance : outcome.instances()) {
    EXPECT_EQ(instance.path().nameSpace(), "root/interop");
    EXPECT_EQ(instance.find("GroupComponent")->asReference().nameSpace(), "root/cimv2");
    EXPECT_EQ(instance.find("PartComponent")->asReference().nameSpace(), "root/interop");
  }
}

TEST_F(SystemDeviceTest, InstancesApplyThePropertyListWithTheRealKeyNames) {
  const Outcome outcome = instances(std::vector<std::string>{"GroupComponent"});
  EXPECT_EQ(outcome.instances().size(), 2u);
  EXPECT_EQ(
      callTexts(outcome, "setPropertyFilter"),
      std::vector<std::string>(2, "CMPIInstanceFT.setPropertyFilter(instance of " + kAssocClass +
                                      ", {GroupComponent}, {GroupComponent, PartComponent})"));
}

TEST_F(SystemDeviceTest, InstancesTakeNullAndEmptyPropertyLists) {
  const Outcome all = instances(std::nullopt);
  EXPECT_EQ(
      callTexts(all, "setPropertyFilter"),
      std::vector<std::string>(2, "CMPIInstanceFT.setPropertyFilter(instance of " + kAssocClass +
                                      ", NULL, {GroupComponent, PartComponent})"));
  EXPECT_EQ(all.instances().size(), 2u);
  // An empty list is one null entry: only the keys remain, and both references are keys.
  const Outcome none = instances(std::vector<std::string>{});
  EXPECT_EQ(none.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(pairsOf(none.instances()), pairsOf(all.instances()));
}

TEST_F(SystemDeviceTest, InstancesWithoutComputerSystemsEndNormallyWithNothing) {
  useComputerSystems({});
  const Outcome outcome = instances();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{enumIn(), builderIn(), builderOut(), enumOut()}));
}

TEST_F(SystemDeviceTest, InstancesWithoutLightsEndNormallyWithNothing) {
  useTree({});
  const Outcome outcome = instances();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
  // The builder stops at the empty light map, without an exit line of its own.
  EXPECT_EQ(providerLog(), (std::vector<std::string>{enumIn(), builderIn(), enumOut()}));
}

TEST_F(SystemDeviceTest, InstancesSurviveAFailingUpcallWithSuccess) {
  broker_.setUpcallFailure("KESTA_ComputerSystem", StatusValue(CMPI_RC_ERR_NOT_FOUND));
  const Outcome outcome = instances();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_TRUE(outcome.traces.empty());
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{enumIn(), builderIn(), kUpcallFailedLine, enumOut()}));
  EXPECT_EQ(levelsOf("Call to CBEnumInstances"),
            (std::vector<std::string>{"LOG 6000", "TRACE 6000"}));
  expectTraceCopy();
}

// The instances: the computer-system class path cannot be made.
TEST_F(SystemDeviceTest, InstancesReportAComputerSystemPathThatCannotBeMade) {
  for (const Fault& fault : {Fault::nullResult(CreatingFunction::NewObjectPath, 1),
                             Fault::nullHandle(CreatingFunction::NewObjectPath, 1)}) {
    SCOPED_TRACE(::testing::PrintToString(fault.kind));
    broker_.clearFaults();
    broker_.armFault(fault);
    clearLog();
    const Outcome outcome = instances();
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(outcome.results.size(), 1u);
    EXPECT_EQ(outcome.doneCount, 1u);
    EXPECT_EQ(traces(outcome),
              (std::vector<std::string>{"2 BlueLightSystemDeviceProvider: Create CMPIObjectPath "
                                        "failed for             ComputerSystemClass."}));
    EXPECT_TRUE(
        hasCall(outcome, "CMPIBrokerEncFT.newString(Create CMPIObjectPath            failed.)"))
        << ::testing::PrintToString(outcome.calls);
    EXPECT_FALSE(hasCall(outcome,
                         "CMPIBrokerFT.enumerateInstanceNames(context, root/cimv2:"
                         "KESTA_ComputerSystem)"));
    EXPECT_EQ(providerLog(), (std::vector<std::string>{enumIn(), builderIn(), enumOut()}));
  }
}

// The instances: a light path without handle stops the builder.
TEST_F(SystemDeviceTest, InstancesStopAtALightPathWithoutHandle) {
  for (std::uint64_t nth : {4u, 8u}) {
    SCOPED_TRACE("addKey " + std::to_string(nth));
    broker_.clearFaults();
    broker_.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), nth));
    clearLog();
    const Outcome outcome = instances();
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    // The builder failed: what it had made is not handed over.
    EXPECT_EQ(outcome.results.size(), 1u);
    EXPECT_EQ(outcome.doneCount, 1u);
    EXPECT_EQ(traces(outcome), (std::vector<std::string>{"2 BlueLightSystemDeviceProvider: "
                                                         "CMPIObjectPath is NULL for BlueLight "
                                                         "Provider"}));
    EXPECT_TRUE(hasCall(
        outcome, "CMPIBrokerEncFT.newString(CMPIObjectPath is NULL for BlueLight Provider)"));
    EXPECT_EQ(providerLog(), (std::vector<std::string>{enumIn(), builderIn(), enumOut()}));
  }
}

// The instances: an association path that cannot be made is reported, that light skipped, the rest
// goes on.
TEST_F(SystemDeviceTest, InstancesSkipALightWhoseAssociationPathCannotBeMade) {
  const std::string call = "CMPIBrokerEncFT.newObjectPath(root/cimv2, " + kAssocClass + ")";
  const Outcome clean = instances();
  for (std::uint64_t occurrence : {1u, 2u}) {
    const std::uint64_t nth = nthCall(clean, "newObjectPath", call, occurrence);
    ASSERT_NE(nth, 0u);
    for (const Fault& fault : {Fault::nullResult(CreatingFunction::NewObjectPath, nth),
                               Fault::nullHandle(CreatingFunction::NewObjectPath, nth)}) {
      SCOPED_TRACE(::testing::PrintToString(fault.kind) + " at light " +
                   std::to_string(occurrence));
      broker_.clearFaults();
      broker_.armFault(fault);
      clearLog();
      const Outcome outcome = instances();
      EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
      EXPECT_EQ(
          pairsOf(outcome.instances()),
          (std::vector<std::string>{"bbhost.example -> " + (occurrence == 1 ? kLight2 : kLight1)}));
      EXPECT_EQ(outcome.results.size(), 2u);
      EXPECT_EQ(outcome.doneCount, 1u);
      EXPECT_EQ(traces(outcome),
                (std::vector<std::string>{"2 BlueLightSystemDeviceProvider: Create "
                                          "CMPIObjectPath failed for                     "
                                          "HostedAccessPoint."}));
      EXPECT_TRUE(hasCall(
          outcome, "CMPIBrokerEncFT.newString(Create CMPIObjectPath failed for HostedAccessPoint)"))
          << ::testing::PrintToString(outcome.calls);
      EXPECT_EQ(providerLog(),
                (std::vector<std::string>{enumIn(), builderIn(), builderOut(), enumOut()}));
    }
  }
}

TEST_F(SystemDeviceTest, InstancesHandOverAnInstanceTheBrokerCouldNotMake) {
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome outcome = instances();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.results.size(), 3u);
  EXPECT_EQ(outcome.results[0].kind, ResultKind::Instance);
  EXPECT_EQ(outcome.results[0].state, ObjectState::NullPointer);
  EXPECT_EQ(pairsOf(outcome.instances()),
            (std::vector<std::string>{"bbhost.example -> " + kLight2}));
  EXPECT_EQ(outcome.doneCount, 1u);
}

// ---- GetInstance --------------------------------------------------------------------------

TEST_F(SystemDeviceTest, GetReturnsTheAskedAssociation) {
  useComputerSystems({"cs1", "cs2"});
  const Outcome outcome = get(associationPath("cs2", kLight2));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(pairsOf(outcome.instances()), (std::vector<std::string>{"cs2 -> " + kLight2}));
  EXPECT_EQ(outcome.results.size(), 2u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{getIn(), builderIn(), builderOut(), getOut()}));
}

TEST_F(SystemDeviceTest, GetOfAnUnknownAssociationGivesNothingWithSuccess) {
  const Outcome outcome = get(associationPath("elsewhere", kLight1));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{getIn(), builderIn(), builderOut(), getOut()}));
}

TEST_F(SystemDeviceTest, GetWithoutKeysFails) {
  const Outcome outcome = get(classPath(kAssocClass));
  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("At least one key should be passed")));
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(traces(outcome),
            (std::vector<std::string>{"2 BlueLightSystemDeviceProvider: At least one key should be "
                                      "passed"}));
  EXPECT_EQ(providerLog(), (std::vector<std::string>{getIn(), getOut()}));
}

TEST_F(SystemDeviceTest, GetWithoutComputerSystemsGivesNothingWithSuccess) {
  useComputerSystems({});
  const Outcome outcome = get(associationPath("bbhost.example", kLight1));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
}

TEST_F(SystemDeviceTest, GetSurvivesAFailingUpcallWithSuccess) {
  broker_.setUpcallFailure("KESTA_ComputerSystem", StatusValue(CMPI_RC_ERR_FAILED));
  const Outcome outcome = get(associationPath("bbhost.example", kLight1));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
  EXPECT_EQ(providerLog(),
            (std::vector<std::string>{getIn(), builderIn(), kUpcallFailedLine, getOut()}));
  EXPECT_EQ(levelsOf("Call to CBEnumInstances"),
            (std::vector<std::string>{"LOG 6000", "TRACE 6000"}));
}

TEST_F(SystemDeviceTest, GetSkipsAnInstanceTheBrokerCouldNotMake) {
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  const Outcome outcome = get(associationPath("bbhost.example", kLight1));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.results.size(), 1u);
  EXPECT_EQ(outcome.doneCount, 1u);
}

// ---- Unsupported operations ---------------------------------------------------------------

TEST_F(SystemDeviceTest, WritingOperationsAreNotSupportedAndSilent) {
  const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
    CMPIObjectPath* path = request.objectPath(classPath(kAssocClass));
    CMPIInstance* instance = request.instance(InstanceValue(classPath(kAssocClass)));
    const CMPIStatus created =
        mi_->ft->createInstance(mi_, request.context(), request.result(), path, instance);
    const CMPIStatus modified =
        mi_->ft->modifyInstance(mi_, request.context(), request.result(), path, instance, nullptr);
    const CMPIStatus deleted =
        mi_->ft->deleteInstance(mi_, request.context(), request.result(), path);
    const CMPIStatus queried = mi_->ft->execQuery(mi_, request.context(), request.result(), path,
                                                  "SELECT * FROM x", "WQL");
    for (const CMPIStatus& status : {created, modified, deleted}) {
      EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
      EXPECT_EQ(status.msg, nullptr);
    }
    return queried;
  });
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_NOT_SUPPORTED));
  EXPECT_TRUE(outcome.calls.empty());
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_TRUE(providerLog().empty());
}

// ---- Robustness ---------------------------------------------------------------------------

// Every creating call of every operation, failed in each way in turn: the operation returns,
// and a success is only reported with the exit line written.
TEST_F(SystemDeviceTest, EveryCreatingCallMayFail) {
  useComputerSystems({"cs1", "cs2"});
  const std::vector<std::function<Outcome()>> operations = {
      [&] { return names(); }, [&] { return instances(std::vector<std::string>{"x"}); },
      [&] { return get(associationPath("cs2", kLight1)); }};
  forEveryCreatingFault(operations,
                        [](const Outcome& outcome) { EXPECT_LE(outcome.doneCount, 1u); });
}

}  // namespace
