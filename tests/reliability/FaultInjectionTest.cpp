// Exhaustive fault injection: every read operation of the four classes, run through the
// in-process host with the provider library loaded as an object manager loads it, has each of
// its creating broker calls made to fail in turn, first by a null result and then by an object
// with a null handle.
//
// For every operation the gate first runs it without faults and reads how often it called each
// creating function (Broker::creationCounts()); then, for every function and every k from 1 to
// that count, it arms a fault on the k-th call and runs the operation again. New calls in the
// module are so covered without touching this file.
//
// What the k-th call was for is read from the calls recorded in the fault-free run (the class of
// the object path asked for, the instance that an array belongs to, ...). Where the module's
// documented failure handling says what must come of that failure, the gate compares the status,
// the broker traces, the objects handed over and the exit line exactly; everywhere else it asks
// for a sane outcome: the operation returns, its status is OK or a failure code, CMReturnDone is
// called at most once and every object handed over is a readable object of a served class.
#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <iostream>
#include <map>
#include <optional>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "BlackboxFixture.h"

namespace {

using blackbox::BlackboxTest;
using cmpihost::CallRecord;
using cmpihost::CreatingFunction;
using cmpihost::Fault;
using cmpihost::FaultKind;
using cmpihost::ObjectPathValue;
using cmpihost::ObjectState;
using cmpihost::Outcome;
using cmpihost::ResultEvent;
using cmpihost::ResultKind;
using cmpihost::StatusValue;

std::string blanks(std::size_t count) { return std::string(count, ' '); }

ObjectPathValue classPathOf(const std::string& className) {
  return ObjectPathValue(blackbox::kNameSpace, className);
}

// The broker traces of an operation, each as "<level> <component>: <text>".
std::vector<std::string> traceTexts(const Outcome& outcome) {
  std::vector<std::string> texts;
  for (const cmpihost::TraceRecord& record : outcome.traces) {
    texts.push_back(std::to_string(record.level) + " " + record.component.value_or("(null)") +
                    ": " + record.text.value_or("(null)"));
  }
  return texts;
}

// ---- The texts the module reports -------------------------------------------------------------

const std::string kLightComponent = "BlueLightProfileProvider";
const std::string kCapsComponent = "BlueLightCapabilitiesProvider";
const std::string kEcComponent = "BlueLightElementCapabilitiesProvider";
const std::string kSdComponent = "BlueLightSystemDeviceProvider";

std::string warning(const std::string& component, const std::string& text) {
  return "2 " + component + ": " + text;
}

const std::string kLightPathStatus = "Create CMPIObjectPath failed.";
const std::string kLightPathTrace =
    warning(kLightComponent, "Create CMPIObjectPath" + blanks(21) + "failed for RecordLogClass.");
const std::string kCapsPathStatus = "Create CMPIObjectPath failed";
const std::string kCapsPathTrace =
    warning(kCapsComponent,
            "Create CMPIObjectPath failed for" + blanks(21) + "BlueLightCapabilities class");
const std::string kLightArrayStatus =
    "Create Array for Property" + blanks(25) + "OperationalStatus failed.";
const std::string kLightArrayTrace = warning(
    kLightComponent, "Create Array for Property Operat" + blanks(24) + "ionalStatus failed.");
const std::string kCapsArrayStatus =
    "Creating array for Property" + blanks(25) + "RequestedAlarmStatesSupported failed.";
const std::string kCapsArrayTrace =
    warning(kCapsComponent,
            "Creating Array for Property" + blanks(25) + "RequestedAlarmStatesSupported failed.");

// ---- Operations --------------------------------------------------------------------------------

enum class Shape {
  EnumNames,      // an instance provider's EnumInstanceNames
  EnumInstances,  // an instance provider's EnumInstances
  GetInstance,    // an instance provider's GetInstance
  Associators,
  AssociatorNames,
  References,
  ReferenceNames
};

enum class Provider { Light, Caps, ElementCaps, SystemDevice };

class FaultInjectionTest;

struct Operation {
  std::string name;  // the test's name
  Provider provider;
  Shape shape;
  std::string function;  // the MI function, whose exit line is looked for in the log
  std::function<Outcome(FaultInjectionTest&)> run;
};

void PrintTo(const Operation& op, std::ostream* out) { *out << op.name; }

std::string providerName(Provider provider) {
  switch (provider) {
    case Provider::Light:
      return blackbox::kLightProvider;
    case Provider::Caps:
      return blackbox::kCapabilitiesProvider;
    case Provider::ElementCaps:
      return blackbox::kElementCapabilitiesProvider;
    case Provider::SystemDevice:
      return blackbox::kSystemDeviceProvider;
  }
  return {};
}

std::string categoryOf(Provider provider) {
  return provider == Provider::Light ? std::string("Varnel.BlueLightProvider")
                                     : "Varnel." + providerName(provider);
}

bool isAssociationShape(Shape shape) {
  return shape == Shape::Associators || shape == Shape::AssociatorNames ||
         shape == Shape::References || shape == Shape::ReferenceNames;
}

// ---- What a creating call was for --------------------------------------------------------------

enum class Role {
  Target,         // the class path of the far end of an association (first path of assoc ops)
  LightPath,      // a light's object path made by the factory's path enumeration
  CapsPath,       // the capabilities object path made by the factory's path enumeration
  LightInstPath,  // the object path of a light instance being built
  LightInst,      // a light instance
  LightArray,     // a light's OperationalStatus array
  CapsInstPath,   // the object path of a capabilities instance being built
  CapsInst,       // a capabilities instance
  CapsArray,      // the RequestedAlarmStatesSupported array
  AssocPath,      // an association object path
  AssocInst,      // an association instance
  CsClassPath,    // the KESTA_ComputerSystem class path of the system-device instances
  Upcall,         // an enumeration up-call to the object manager
  GetObjectPath,  // the object path of an instance, taken back from it
  Other
};

const char* roleName(Role role) {
  switch (role) {
    case Role::Target:
      return "Target";
    case Role::LightPath:
      return "LightPath";
    case Role::CapsPath:
      return "CapsPath";
    case Role::LightInstPath:
      return "LightInstPath";
    case Role::LightInst:
      return "LightInst";
    case Role::LightArray:
      return "LightArray";
    case Role::CapsInstPath:
      return "CapsInstPath";
    case Role::CapsInst:
      return "CapsInst";
    case Role::CapsArray:
      return "CapsArray";
    case Role::AssocPath:
      return "AssocPath";
    case Role::AssocInst:
      return "AssocInst";
    case Role::CsClassPath:
      return "CsClassPath";
    case Role::Upcall:
      return "Upcall";
    case Role::GetObjectPath:
      return "GetObjectPath";
    case Role::Other:
      return "Other";
  }
  return "?";
}

// One creating call of the fault-free run.
struct CreatingCall {
  CreatingFunction function;
  std::uint64_t nth = 0;  // the how-manieth call of `function` it was
  Role role = Role::Other;
  unsigned ordinal = 0;       // the how-manieth call of its role it was
  std::size_t callIndex = 0;  // its place in Outcome::calls
};

std::optional<CreatingFunction> creatingFunctionOf(const CallRecord& call) {
  for (CreatingFunction function : cmpihost::allCreatingFunctions()) {
    if (call.function == cmpihost::toString(function)) return function;
  }
  return std::nullopt;
}

std::string classOfPathText(const std::string& text) {
  std::optional<ObjectPathValue> path = ObjectPathValue::parse(text);
  return path ? path->className() : std::string();
}

// Reads the creating calls of a fault-free run and tells what each one was for.
std::vector<CreatingCall> classify(const Operation& op, const Outcome& base) {
  std::vector<CreatingCall> calls;
  std::map<CreatingFunction, std::uint64_t> nth;
  std::map<Role, unsigned> ordinal;
  bool seenPath = false;
  Role lastInstance = Role::Other;
  for (std::size_t i = 0; i < base.calls.size(); ++i) {
    std::optional<CreatingFunction> function = creatingFunctionOf(base.calls[i]);
    if (!function) continue;
    CreatingCall call{*function, ++nth[*function], Role::Other, 0, i};
    const std::vector<std::string>& args = base.calls[i].args;
    switch (*function) {
      case CreatingFunction::NewObjectPath: {
        const std::string cls = args.size() > 1 ? args[1] : std::string();
        // The class of the next instance made, if the next creating call makes one.
        std::string nextInstanceClass;
        for (std::size_t j = i + 1; j < base.calls.size(); ++j) {
          std::optional<CreatingFunction> next = creatingFunctionOf(base.calls[j]);
          if (!next) continue;
          if (*next == CreatingFunction::NewInstance && !base.calls[j].args.empty()) {
            nextInstanceClass = classOfPathText(base.calls[j].args[0]);
          }
          break;
        }
        if (isAssociationShape(op.shape) && !seenPath) {
          call.role = Role::Target;
        } else if (cls == "KESTA_BlueLightElementCapabilities" ||
                   cls == "KESTA_BlueLightSystemDevice") {
          call.role = Role::AssocPath;
        } else if (cls == "KESTA_ComputerSystem") {
          call.role = Role::CsClassPath;
        } else if (cls == "KESTA_BlueLight") {
          call.role = nextInstanceClass == cls ? Role::LightInstPath : Role::LightPath;
        } else if (cls == "KESTA_BlueLightCapabilities") {
          call.role = nextInstanceClass == cls ? Role::CapsInstPath : Role::CapsPath;
        }
        seenPath = true;
        break;
      }
      case CreatingFunction::NewInstance: {
        const std::string cls = args.empty() ? std::string() : classOfPathText(args[0]);
        if (cls == "KESTA_BlueLight") {
          call.role = Role::LightInst;
        } else if (cls == "KESTA_BlueLightCapabilities") {
          call.role = Role::CapsInst;
        } else {
          call.role = Role::AssocInst;
        }
        lastInstance = call.role;
        break;
      }
      case CreatingFunction::NewArray:
        call.role = lastInstance == Role::CapsInst ? Role::CapsArray : Role::LightArray;
        break;
      case CreatingFunction::GetObjectPath:
        call.role = Role::GetObjectPath;
        break;
      case CreatingFunction::EnumerateInstanceNames:
      case CreatingFunction::EnumerateInstances:
        call.role = Role::Upcall;
        break;
      default:
        break;
    }
    call.ordinal = ++ordinal[call.role];
    calls.push_back(call);
  }
  return calls;
}

// ---- Outcomes as short codes -------------------------------------------------------------------

// I/P: a readable instance/path, I0/P0: a null pointer, Ih/Ph: an object with a null handle,
// D: CMReturnDone.
std::string eventCode(const ResultEvent& event) {
  std::string code;
  switch (event.kind) {
    case ResultKind::Instance:
      code = "I";
      break;
    case ResultKind::ObjectPath:
      code = "P";
      break;
    case ResultKind::Done:
      return "D";
    case ResultKind::Data:
      return "Data";
    case ResultKind::Error:
      return "Error";
  }
  if (event.state == ObjectState::NullPointer) code += "0";
  if (event.state == ObjectState::NullHandle) code += "h";
  return code;
}

std::vector<std::string> eventCodes(const Outcome& outcome) {
  std::vector<std::string> codes;
  for (const ResultEvent& event : outcome.results) codes.push_back(eventCode(event));
  return codes;
}

std::string join(const std::vector<std::string>& items) {
  std::string text;
  for (const std::string& item : items) text += (text.empty() ? "" : ", ") + item;
  return "[" + text + "]";
}

// The hand-overs of the fault-free run that came before call `callIndex` (no CMReturnDone).
std::vector<std::string> handedBefore(const Outcome& base, std::size_t callIndex) {
  std::size_t count = 0;
  for (std::size_t i = 0; i < callIndex && i < base.calls.size(); ++i) {
    const CallRecord& call = base.calls[i];
    if (call.table == "CMPIResultFT" &&
        (call.function == "returnInstance" || call.function == "returnObjectPath")) {
      ++count;
    }
  }
  std::vector<std::string> codes;
  for (const ResultEvent& event : base.results) {
    if (codes.size() == count) break;
    if (event.kind != ResultKind::Done) codes.push_back(eventCode(event));
  }
  return codes;
}

// The fault-free hand-overs with the `ordinal`-th one replaced (or removed when `code` is empty).
std::vector<std::string> replaced(const Outcome& base, unsigned ordinal, const std::string& code) {
  std::vector<std::string> codes;
  unsigned seen = 0;
  for (const ResultEvent& event : base.results) {
    if (event.kind != ResultKind::Done && ++seen == ordinal) {
      if (!code.empty()) codes.push_back(code);
      continue;
    }
    codes.push_back(eventCode(event));
  }
  return codes;
}

// Every fault-free hand-over replaced by `code`.
std::vector<std::string> allReplaced(const Outcome& base, const std::string& code) {
  std::vector<std::string> codes;
  for (const ResultEvent& event : base.results) {
    codes.push_back(event.kind == ResultKind::Done ? "D" : code);
  }
  return codes;
}

// ---- Expectations ------------------------------------------------------------------------------

struct Expect {
  std::optional<StatusValue> status;  // compared exactly
  std::optional<CMPIrc> rc;           // only the code
  std::optional<std::vector<std::string>> traces;
  std::optional<std::vector<std::string>> events;
  std::optional<bool> exitLine;
  // Further checks of the outcome.
  std::function<void(const Outcome&)> extra;
  bool described() const { return status || rc || traces || events || exitLine; }
};

std::vector<std::string> plus(std::vector<std::string> items,
                              const std::vector<std::string>& more) {
  items.insert(items.end(), more.begin(), more.end());
  return items;
}

// The instance handed over in the `ordinal`-th hand-over carries exactly these properties.
std::function<void(const Outcome&)> propertiesOf(unsigned ordinal,
                                                 const std::vector<std::string>& names) {
  return [ordinal, names](const Outcome& outcome) {
    unsigned seen = 0;
    for (const ResultEvent& event : outcome.results) {
      if (event.kind == ResultKind::Done || ++seen != ordinal) continue;
      ASSERT_NE(event.instance(), nullptr) << event;
      std::vector<std::string> actual;
      for (const cmpihost::Property& property : event.instance()->properties()) {
        actual.push_back(property.name);
      }
      EXPECT_EQ(join(actual), join(names));
    }
  };
}

const std::vector<std::string> kLightPropertiesUpToHealth = {"CreationClassName",
                                                             "DeviceID",
                                                             "SystemCreationClassName",
                                                             "SystemName",
                                                             "Caption",
                                                             "Description",
                                                             "Name",
                                                             "ElementName",
                                                             "RequestedState",
                                                             "HealthState"};

bool isBuilderShape(const Operation& op) {
  return (op.provider == Provider::ElementCaps || op.provider == Provider::SystemDevice) &&
         (op.shape == Shape::EnumInstances || op.shape == Shape::GetInstance);
}

std::string noTargetText(Shape shape) {
  switch (shape) {
    case Shape::Associators:
      return "Object Path is NULL in Associators.";
    case Shape::AssociatorNames:
      return "Object Path is NULL in AssociatorsNames.";
    case Shape::References:
      return "Object Path is NULL in References.";
    case Shape::ReferenceNames:
      return "Object Path is NULL in ReferenceNames.";
    default:
      return "";
  }
}

// The instance that GetInstance of an association looks for is the second one built.
constexpr unsigned kMatchOrdinal = 2;

Expect expectation(const Operation& op, const CreatingCall& call, FaultKind kind,
                   const Outcome& base, const std::vector<CreatingCall>& all) {
  Expect e;
  const bool nullResult = kind == FaultKind::NullResult;
  const std::vector<std::string> baseTraces = traceTexts(base);
  const bool builder = isBuilderShape(op);
  const bool getInstanceWalk = builder && op.shape == Shape::GetInstance;
  // A GetInstance walk finds its instance unless the fault took that very instance away.
  auto walk = [&](bool lost) {
    return lost ? std::vector<std::string>{"D"} : std::vector<std::string>{"I", "D"};
  };
  auto countOf = [&](Role role) {
    unsigned count = 0;
    for (const CreatingCall& c : all) count += c.role == role ? 1 : 0;
    return count;
  };

  switch (call.role) {
    case Role::LightPath:
    case Role::CapsPath: {
      const bool light = call.role == Role::LightPath;
      const std::string trace = light ? kLightPathTrace : kCapsPathTrace;
      if (builder) {
        // The builders keep their failures to themselves; the operation ends normally.
        std::vector<std::string> traces = plus(baseTraces, {trace});
        if (op.provider == Provider::ElementCaps) {
          traces.push_back(warning(
              kEcComponent, light ? "***Can't get BlueLight ObjectPaths." + blanks(13) +
                                        "Exiting EnumerateInstanceNames***"
                                  : "***Can't get ObjectPaths for" + blanks(17) + "Capabilities" +
                                        blanks(17) + "Exiting EnumerateInstanceNames***"));
        }
        e.traces = traces;
        e.events = std::vector<std::string>{"D"};
        e.exitLine = true;
        if (op.shape == Shape::EnumInstances) e.status = StatusValue(CMPI_RC_OK);
      } else {
        e.status = StatusValue(CMPI_RC_ERR_FAILED, light ? kLightPathStatus : kCapsPathStatus);
        e.traces = plus(baseTraces, {trace});
        e.events = handedBefore(base, call.callIndex);
        e.exitLine = false;
      }
      break;
    }
    case Role::LightInstPath:
    case Role::LightInst:
    case Role::CapsInstPath:
      // The builder gives a null instance, which is handed over as it is.
      e.events = replaced(base, call.ordinal, "I0");
      e.traces = baseTraces;
      e.exitLine = true;
      e.status = StatusValue(CMPI_RC_OK);
      break;
    case Role::CapsInst:
      // An instance with a null handle is handed back unchanged.
      e.events = replaced(base, call.ordinal, nullResult ? "I0" : "Ih");
      e.traces = baseTraces;
      e.exitLine = true;
      e.status = StatusValue(CMPI_RC_OK);
      break;
    case Role::LightArray:
      if (nullResult) {
        e.events = eventCodes(base);
        e.traces = plus(baseTraces, {kLightArrayTrace});
        e.exitLine = true;
        e.extra = propertiesOf(call.ordinal, kLightPropertiesUpToHealth);
        // The status is the last broker call's outcome: the failure stands when no light
        // instance was built after it.
        if (call.ordinal == countOf(Role::LightArray)) {
          e.status = StatusValue(CMPI_RC_ERR_FAILED, kLightArrayStatus);
        }
      }
      break;
    case Role::CapsArray:
      if (nullResult) {
        e.events = eventCodes(base);
        e.traces = plus(baseTraces, {kCapsArrayTrace});
        e.exitLine = true;
        e.status = StatusValue(CMPI_RC_ERR_FAILED, kCapsArrayStatus);
        e.extra = propertiesOf(call.ordinal, {"InstanceID"});
      }
      break;
    case Role::Target:
      e.events = std::vector<std::string>{};
      e.exitLine = false;
      if (op.provider == Provider::SystemDevice &&
          (op.shape == Shape::Associators || op.shape == Shape::AssociatorNames)) {
        // The system-device associators end silently without a far end.
        e.status = StatusValue(CMPI_RC_OK);
        e.traces = baseTraces;
      } else {
        const std::string text = noTargetText(op.shape);
        e.status = StatusValue(CMPI_RC_ERR_FAILED, text);
        e.traces = plus(
            baseTraces,
            {warning(op.provider == Provider::ElementCaps ? kEcComponent : kSdComponent, text)});
      }
      break;
    case Role::AssocPath:
      if (op.shape == Shape::References || op.shape == Shape::ReferenceNames) {
        // One shared association path: every association is made on the failed path and
        // handed over as it is.
        e.events = allReplaced(base, op.shape == Shape::References ? "I0" : "P0");
        e.traces = baseTraces;
        e.exitLine = true;
      } else if (op.shape == Shape::EnumNames && op.provider == Provider::ElementCaps) {
        e.status = StatusValue(CMPI_RC_ERR_FAILED, "Create CMPIObjectPath failed" + blanks(21) +
                                                       "for ElementCapabilities");
        e.traces = std::vector<std::string>{
            warning(kEcComponent,
                    "Create CMPIObjectPath failed" + blanks(21) + "for ElementCapabilities.")};
        e.events = handedBefore(base, call.callIndex);
        e.exitLine = false;
      } else if (op.shape == Shape::EnumNames && op.provider == Provider::SystemDevice) {
        e.status = StatusValue(CMPI_RC_ERR_FAILED, "Create CMPIObjectPath failed" + blanks(21) +
                                                       "for BlueLightSystemDeviceProvider.");
        e.traces = std::vector<std::string>{warning(
            kSdComponent,
            "Create CMPIObjectPath failed for" + blanks(21) + "BlueLightSystemDeviceClass.")};
        e.events = handedBefore(base, call.callIndex);
        e.exitLine = false;
      } else if (builder && op.provider == Provider::ElementCaps) {
        e.traces = std::vector<std::string>{
            warning(kEcComponent, "Create CMPIObjectPath failed for ElementCapabilities.")};
        e.events = getInstanceWalk ? walk(true) : std::vector<std::string>{"D"};
        e.exitLine = true;
        e.status = StatusValue(CMPI_RC_OK);
      } else if (builder && op.provider == Provider::SystemDevice) {
        // Reported, and the enumeration goes on without that pair.
        e.traces = std::vector<std::string>{warning(
            kSdComponent, "Create CMPIObjectPath failed for" + blanks(21) + "HostedAccessPoint.")};
        e.events = getInstanceWalk ? walk(call.ordinal == kMatchOrdinal)
                                   : replaced(base, call.ordinal, "");
        e.exitLine = true;
        e.status = StatusValue(CMPI_RC_OK);
      }
      break;
    case Role::AssocInst:
      if (getInstanceWalk) {
        e.events = walk(call.ordinal == kMatchOrdinal);
        e.exitLine = true;
        e.traces = baseTraces;
      } else if (op.shape == Shape::ReferenceNames) {
        e.events = replaced(base, call.ordinal, "P0");
        e.exitLine = true;
        e.traces = baseTraces;
      } else {
        e.events = replaced(base, call.ordinal, nullResult ? "I0" : "Ih");
        e.exitLine = true;
        e.traces = baseTraces;
        if (builder) e.status = StatusValue(CMPI_RC_OK);
      }
      break;
    case Role::CsClassPath:
      if (op.shape == Shape::EnumNames) {
        e.status = StatusValue(CMPI_RC_ERR_FAILED, "Create CMPIObjectPath failed.");
        e.traces = std::vector<std::string>{
            warning(kSdComponent, "Create CMPIObjectPath failed for ComputerSystemClass.")};
        e.events = std::vector<std::string>{};
        e.exitLine = false;
      } else {
        e.traces = std::vector<std::string>{
            warning(kSdComponent,
                    "Create CMPIObjectPath failed for" + blanks(13) + "ComputerSystemClass.")};
        e.events = std::vector<std::string>{"D"};
        e.exitLine = true;
        e.status = StatusValue(CMPI_RC_OK);
      }
      break;
    case Role::GetObjectPath:
      if (getInstanceWalk) {
        e.events = walk(call.ordinal == kMatchOrdinal);
        e.exitLine = true;
      } else if (op.shape == Shape::ReferenceNames) {
        e.events = replaced(base, call.ordinal, nullResult ? "P0" : "Ph");
        e.exitLine = true;
      }
      break;
    case Role::Upcall:
      // An enumeration the broker could not make, without saying why: the systems are not
      // known, so nothing is paired with them.
      e.extra = [](const Outcome& outcome) {
        EXPECT_EQ(outcome.count(ResultKind::Instance) + outcome.count(ResultKind::ObjectPath), 0u);
      };
      break;
    case Role::Other:
      break;
  }
  return e;
}

// ---- Sanity of any outcome ---------------------------------------------------------------------

const std::set<std::string> kServedClasses = {
    "KESTA_BlueLight", "KESTA_BlueLightCapabilities", "KESTA_BlueLightElementCapabilities",
    "KESTA_BlueLightSystemDevice", "KESTA_ComputerSystem"};

void expectSane(const Outcome& outcome, bool eventsDescribed) {
  const std::set<CMPIrc> codes = {CMPI_RC_OK, CMPI_RC_ERR_FAILED, CMPI_RC_ERR_INVALID_HANDLE,
                                  CMPI_RC_ERR_INVALID_PARAMETER, CMPI_RC_ERR_NOT_FOUND};
  EXPECT_TRUE(codes.count(outcome.status.rc) == 1) << outcome.status;
  if (!outcome.status.ok() && outcome.status.message) {
    EXPECT_FALSE(outcome.status.message->empty());
  }
  EXPECT_LE(outcome.doneCount, 1u);
  if (outcome.doneCount == 1) {
    EXPECT_EQ(outcome.results.back().kind, ResultKind::Done) << "hand-over after CMReturnDone";
  }
  for (const ResultEvent& event : outcome.results) {
    EXPECT_TRUE(event.kind == ResultKind::Instance || event.kind == ResultKind::ObjectPath ||
                event.kind == ResultKind::Done)
        << event;
    if (!eventsDescribed && event.kind != ResultKind::Done) {
      EXPECT_EQ(event.state, ObjectState::Valid) << "an unreadable object was handed over";
    }
    if (const cmpihost::InstanceValue* instance = event.instance()) {
      EXPECT_EQ(kServedClasses.count(instance->className()), 1u) << *instance;
    }
    if (const ObjectPathValue* path = event.path()) {
      EXPECT_EQ(kServedClasses.count(path->className()), 1u) << *path;
    }
  }
}

// ---- The gate ----------------------------------------------------------------------------------

std::uint64_t& casesRun() {
  static std::uint64_t count = 0;
  return count;
}

class CaseCountReport : public ::testing::Environment {
 public:
  void TearDown() override {
    std::cout << "[fault injection] (operation, function, k, kind) cases run: " << casesRun()
              << std::endl;
  }
};

const ::testing::Environment* const kReport =
    ::testing::AddGlobalTestEnvironment(new CaseCountReport);

const std::vector<std::string> kSystems = {"cs1.example", "cs2.example"};

class FaultInjectionTest : public BlackboxTest, public ::testing::WithParamInterface<Operation> {
 protected:
  void SetUp() override {
    // Three lights, reported out of key order, and two computer systems, so that the failure
    // rows about a second light and a second system are reached.
    useTree({testsupport::blueLight("1.3"), testsupport::blueLight("1.1", 20u, 1u),
             testsupport::blueLight("1.2", std::nullopt, std::nullopt)});
    useComputerSystems(kSystems);
    light_ = instanceMI(blackbox::kLightProvider);
    caps_ = instanceMI(blackbox::kCapabilitiesProvider);
    ecInstances_ = instanceMI(blackbox::kElementCapabilitiesProvider);
    sdInstances_ = instanceMI(blackbox::kSystemDeviceProvider);
    ec_ = associationMI(blackbox::kElementCapabilitiesProvider);
    sd_ = associationMI(blackbox::kSystemDeviceProvider);

    // The sources of the association operations and the objects that GetInstance asks for are
    // taken from the provider's own answers.
    lightRef_ =
        secondPath(cmpihost::enumerateInstanceNames(broker_, light_, classPath("KESTA_BlueLight")));
    Outcome caps =
        cmpihost::enumerateInstanceNames(broker_, caps_, classPath("KESTA_BlueLightCapabilities"));
    ASSERT_EQ(caps.paths().size(), 1u);
    capsRef_ = caps.paths()[0];
    csRef_ = computerSystemPath(kSystems[0]);
    ecCop_ = secondPath(cmpihost::enumerateInstanceNames(
        broker_, ecInstances_, classPath("KESTA_BlueLightElementCapabilities")));
    sdCop_ = secondPath(cmpihost::enumerateInstanceNames(broker_, sdInstances_,
                                                         classPath("KESTA_BlueLightSystemDevice")));
  }

  static ObjectPathValue secondPath(const Outcome& outcome) {
    std::vector<ObjectPathValue> paths = outcome.paths();
    if (paths.size() < 2) throw std::runtime_error("fewer than two paths");
    return paths[1];
  }

  bool exitLineWritten(const Operation& op) const {
    const std::string prefix = "EXITING: " + op.function + "()";
    for (const testsupport::LogLine& line :
         blackbox::providerLog().lines(categoryOf(op.provider))) {
      if (line.text.compare(0, prefix.size(), prefix) == 0) return true;
    }
    return false;
  }

 public:
  CMPIInstanceMI* light_ = nullptr;
  CMPIInstanceMI* caps_ = nullptr;
  CMPIInstanceMI* ecInstances_ = nullptr;
  CMPIInstanceMI* sdInstances_ = nullptr;
  CMPIAssociationMI* ec_ = nullptr;
  CMPIAssociationMI* sd_ = nullptr;
  ObjectPathValue lightRef_, capsRef_, csRef_, ecCop_, sdCop_;

  cmpihost::Broker& broker() { return broker_; }
};

TEST_P(FaultInjectionTest, EveryCreatingCallFailsInTurn) {
  const Operation& op = GetParam();
  broker_.clearFaults();
  broker_.resetCreationCounts();
  clearLog();
  const Outcome base = op.run(*this);
  const cmpihost::CreationCounts counts = broker_.creationCounts();
  ASSERT_GT(counts.total(), 0u);
  ASSERT_TRUE(base.status.ok()) << base.status;
  if (op.shape == Shape::GetInstance) {
    ASSERT_EQ(eventCodes(base), (std::vector<std::string>{"I", "D"}));
  }

  const std::vector<CreatingCall> calls = classify(op, base);
  // The recorded calls and the broker's counters must tell the same story.
  for (CreatingFunction function : cmpihost::allCreatingFunctions()) {
    std::uint64_t recorded = 0;
    for (const CreatingCall& call : calls) recorded += call.function == function ? 1 : 0;
    ASSERT_EQ(recorded, counts[function]) << function;
  }
  if (std::getenv("RELIABILITY_DUMP") != nullptr) {
    std::cout << op.name << " fault-free: " << base.status << " " << join(eventCodes(base)) << "\n";
    for (const CreatingCall& call : calls) {
      std::cout << "  " << call.function << " #" << call.nth << " " << roleName(call.role) << " "
                << call.ordinal << ": " << base.calls[call.callIndex] << "\n";
    }
  }

  unsigned described = 0;
  for (const CreatingCall& call : calls) {
    for (FaultKind kind : {FaultKind::NullResult, FaultKind::NullHandle}) {
      SCOPED_TRACE(op.name + ": " + cmpihost::toString(call.function) + " #" +
                   std::to_string(call.nth) + " (" + roleName(call.role) + " " +
                   std::to_string(call.ordinal) + ") " + cmpihost::toString(kind));
      broker_.clearFaults();
      clearLog();
      const cmpihost::FaultId id = broker_.armFault(
          kind == FaultKind::NullResult ? Fault::nullResult(call.function, call.nth)
                                        : Fault::nullHandle(call.function, call.nth));
      const Outcome outcome = op.run(*this);
      ++casesRun();
      EXPECT_EQ(broker_.faultFireCount(id), 1u);

      const Expect e = expectation(op, call, kind, base, calls);
      described += e.described() ? 1 : 0;
      expectSane(outcome, e.events.has_value());
      if (e.status) {
        EXPECT_EQ(outcome.status, *e.status);
      }
      if (e.rc) {
        EXPECT_EQ(outcome.status.rc, *e.rc) << outcome.status;
      }
      if (e.traces) {
        EXPECT_EQ(join(traces(outcome)), join(*e.traces));
      }
      if (e.events) {
        EXPECT_EQ(join(eventCodes(outcome)), join(*e.events));
      }
      if (e.exitLine) {
        EXPECT_EQ(exitLineWritten(op), *e.exitLine);
      }
      if (e.extra) e.extra(outcome);
    }
  }
  broker_.clearFaults();
  RecordProperty("cases", static_cast<int>(calls.size() * 2));
  RecordProperty("described", static_cast<int>(described));
}

// ---- The operations ----------------------------------------------------------------------------

using F = FaultInjectionTest;

std::vector<Operation> operations() {
  const std::string ecClass = "KESTA_BlueLightElementCapabilities";
  const std::string sdClass = "KESTA_BlueLightSystemDevice";
  return {
      {"Light_EnumInstanceNames", Provider::Light, Shape::EnumNames, "BlueLight_EnumInstanceNames",
       [](F& t) {
         return cmpihost::enumerateInstanceNames(t.broker(), t.light_,
                                                 classPathOf("KESTA_BlueLight"));
       }},
      {"Light_EnumInstances", Provider::Light, Shape::EnumInstances, "BlueLight_EnumInstances",
       [](F& t) {
         return cmpihost::enumerateInstances(t.broker(), t.light_, classPathOf("KESTA_BlueLight"));
       }},
      {"Light_GetInstance", Provider::Light, Shape::GetInstance, "BlueLight_GetInstance",
       [](F& t) { return cmpihost::getInstance(t.broker(), t.light_, t.lightRef_); }},
      {"Capabilities_EnumInstanceNames", Provider::Caps, Shape::EnumNames,
       "BlueLightCapabilities_EnumInstanceNames",
       [](F& t) {
         return cmpihost::enumerateInstanceNames(t.broker(), t.caps_,
                                                 classPathOf("KESTA_BlueLightCapabilities"));
       }},
      {"Capabilities_EnumInstances", Provider::Caps, Shape::EnumInstances,
       "BlueLightCapabilities_EnumInstances",
       [](F& t) {
         return cmpihost::enumerateInstances(t.broker(), t.caps_,
                                             classPathOf("KESTA_BlueLightCapabilities"));
       }},
      {"Capabilities_GetInstance", Provider::Caps, Shape::GetInstance,
       "BlueLightCapabilities_GetInstance",
       [](F& t) { return cmpihost::getInstance(t.broker(), t.caps_, t.capsRef_); }},
      {"ElementCapabilities_EnumInstanceNames", Provider::ElementCaps, Shape::EnumNames,
       "BlueLightElementCapabilities_EnumInstanceNames",
       [ecClass](F& t) {
         return cmpihost::enumerateInstanceNames(t.broker(), t.ecInstances_, classPathOf(ecClass));
       }},
      {"ElementCapabilities_EnumInstances", Provider::ElementCaps, Shape::EnumInstances,
       "BlueLightElementCapabilities_EnumInstances",
       [ecClass](F& t) {
         return cmpihost::enumerateInstances(t.broker(), t.ecInstances_, classPathOf(ecClass));
       }},
      {"ElementCapabilities_GetInstance", Provider::ElementCaps, Shape::GetInstance,
       "BlueLightElementCapabilities_GetInstance",
       [](F& t) { return cmpihost::getInstance(t.broker(), t.ecInstances_, t.ecCop_); }},
      {"ElementCapabilities_Associators_FromLight", Provider::ElementCaps, Shape::Associators,
       "BlueLightElementCapabilities_Associators",
       [ecClass](F& t) { return cmpihost::associators(t.broker(), t.ec_, t.lightRef_, ecClass); }},
      {"ElementCapabilities_Associators_FromCapabilities", Provider::ElementCaps,
       Shape::Associators, "BlueLightElementCapabilities_Associators",
       [ecClass](F& t) { return cmpihost::associators(t.broker(), t.ec_, t.capsRef_, ecClass); }},
      {"ElementCapabilities_AssociatorNames_FromLight", Provider::ElementCaps,
       Shape::AssociatorNames, "BlueLightElementCapabilities_AssociatorNames",
       [ecClass](F& t) {
         return cmpihost::associatorNames(t.broker(), t.ec_, t.lightRef_, ecClass);
       }},
      {"ElementCapabilities_AssociatorNames_FromCapabilities", Provider::ElementCaps,
       Shape::AssociatorNames, "BlueLightElementCapabilities_AssociatorNames",
       [ecClass](F& t) {
         return cmpihost::associatorNames(t.broker(), t.ec_, t.capsRef_, ecClass);
       }},
      {"ElementCapabilities_References_FromLight", Provider::ElementCaps, Shape::References,
       "BlueLightElementCapabilities_References",
       [](F& t) { return cmpihost::references(t.broker(), t.ec_, t.lightRef_); }},
      {"ElementCapabilities_References_FromCapabilities", Provider::ElementCaps, Shape::References,
       "BlueLightElementCapabilities_References",
       [](F& t) { return cmpihost::references(t.broker(), t.ec_, t.capsRef_); }},
      {"ElementCapabilities_ReferenceNames_FromLight", Provider::ElementCaps, Shape::ReferenceNames,
       "BlueLightElementCapabilities_ReferenceNames",
       [](F& t) { return cmpihost::referenceNames(t.broker(), t.ec_, t.lightRef_); }},
      {"ElementCapabilities_ReferenceNames_FromCapabilities", Provider::ElementCaps,
       Shape::ReferenceNames, "BlueLightElementCapabilities_ReferenceNames",
       [](F& t) { return cmpihost::referenceNames(t.broker(), t.ec_, t.capsRef_); }},
      {"SystemDevice_EnumInstanceNames", Provider::SystemDevice, Shape::EnumNames,
       "BlueLightSystemDevice_EnumInstanceNames",
       [sdClass](F& t) {
         return cmpihost::enumerateInstanceNames(t.broker(), t.sdInstances_, classPathOf(sdClass));
       }},
      {"SystemDevice_EnumInstances", Provider::SystemDevice, Shape::EnumInstances,
       "BlueLightSystemDevice_EnumInstances",
       [sdClass](F& t) {
         return cmpihost::enumerateInstances(t.broker(), t.sdInstances_, classPathOf(sdClass));
       }},
      {"SystemDevice_GetInstance", Provider::SystemDevice, Shape::GetInstance,
       "BlueLightSystemDevice_GetInstance",
       [](F& t) { return cmpihost::getInstance(t.broker(), t.sdInstances_, t.sdCop_); }},
      {"SystemDevice_Associators_FromComputerSystem", Provider::SystemDevice, Shape::Associators,
       "BlueLightSystemDevice_Associators",
       [sdClass](F& t) { return cmpihost::associators(t.broker(), t.sd_, t.csRef_, sdClass); }},
      {"SystemDevice_Associators_FromLight", Provider::SystemDevice, Shape::Associators,
       "BlueLightSystemDevice_Associators",
       [sdClass](F& t) { return cmpihost::associators(t.broker(), t.sd_, t.lightRef_, sdClass); }},
      {"SystemDevice_AssociatorNames_FromComputerSystem", Provider::SystemDevice,
       Shape::AssociatorNames, "BlueLightSystemDevice_AssociatorNames",
       [sdClass](F& t) { return cmpihost::associatorNames(t.broker(), t.sd_, t.csRef_, sdClass); }},
      {"SystemDevice_AssociatorNames_FromLight", Provider::SystemDevice, Shape::AssociatorNames,
       "BlueLightSystemDevice_AssociatorNames",
       [sdClass](F& t) {
         return cmpihost::associatorNames(t.broker(), t.sd_, t.lightRef_, sdClass);
       }},
      {"SystemDevice_References_FromComputerSystem", Provider::SystemDevice, Shape::References,
       "BlueLightSystemDevice_References",
       [](F& t) { return cmpihost::references(t.broker(), t.sd_, t.csRef_); }},
      {"SystemDevice_References_FromLight", Provider::SystemDevice, Shape::References,
       "BlueLightSystemDevice_References",
       [](F& t) { return cmpihost::references(t.broker(), t.sd_, t.lightRef_); }},
      {"SystemDevice_ReferenceNames_FromComputerSystem", Provider::SystemDevice,
       Shape::ReferenceNames, "BlueLightSystemDevice_ReferenceNames",
       [](F& t) { return cmpihost::referenceNames(t.broker(), t.sd_, t.csRef_); }},
      {"SystemDevice_ReferenceNames_FromLight", Provider::SystemDevice, Shape::ReferenceNames,
       "BlueLightSystemDevice_ReferenceNames",
       [](F& t) { return cmpihost::referenceNames(t.broker(), t.sd_, t.lightRef_); }},
  };
}

INSTANTIATE_TEST_SUITE_P(AllOperations, FaultInjectionTest, ::testing::ValuesIn(operations()),
                         [](const ::testing::TestParamInfo<Operation>& info) {
                           return info.param.name;
                         });

}  // namespace
