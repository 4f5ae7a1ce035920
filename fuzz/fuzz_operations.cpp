// Fuzz target: the read operations of the four providers, driven through the in-process host.
//
// The module's objects are linked into this program and its MI factory functions are called
// directly, as an object manager would call them after loading the library: the provider library
// itself cannot be built with the fuzzer's sanitizers, since its link refuses undefined symbols
// and the sanitizer runtimes live in the executable.
//
// The input chooses a provider and an operation, the object path (a well-formed path of a light,
// the capabilities, a computer system or an association, possibly bent, or one made of fuzzed
// class, namespace, keys and values of any CMPI type, or none at all), the property list, the
// association filters (null included), the namespace, principal and invocation flags of the
// context, whether the MI gets a null broker, what the computer-system up-call answers, and a
// fault of the broker. The tree is fixed (three blue lights and a fan);
// now and then it is empty or missing.
// Each input runs on a fresh broker; it must not crash, leak, hand back more than one
// returnDone, or leave objects with the broker outside any request.
#include <fuzzer/FuzzedDataProvider.h>
#include <unistd.h>

#include <cmpihost/cmpihost.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <optional>
#include <string>
#include <vector>

CMPI_EXTERN_C CMPIInstanceMI* BlueLightProfileProvider_Create_InstanceMI(const CMPIBroker*,
                                                                         const CMPIContext*,
                                                                         CMPIStatus*);
CMPI_EXTERN_C CMPIInstanceMI* BlueLightCapabilitiesProvider_Create_InstanceMI(const CMPIBroker*,
                                                                              const CMPIContext*,
                                                                              CMPIStatus*);
CMPI_EXTERN_C CMPIInstanceMI* BlueLightElementCapabilitiesProvider_Create_InstanceMI(
    const CMPIBroker*, const CMPIContext*, CMPIStatus*);
CMPI_EXTERN_C CMPIAssociationMI* BlueLightElementCapabilitiesProvider_Create_AssociationMI(
    const CMPIBroker*, const CMPIContext*, CMPIStatus*);
CMPI_EXTERN_C CMPIInstanceMI* BlueLightSystemDeviceProvider_Create_InstanceMI(const CMPIBroker*,
                                                                              const CMPIContext*,
                                                                              CMPIStatus*);
CMPI_EXTERN_C CMPIAssociationMI* BlueLightSystemDeviceProvider_Create_AssociationMI(
    const CMPIBroker*, const CMPIContext*, CMPIStatus*);

namespace {

using cmpihost::ObjectPathValue;
using cmpihost::OptionalText;
using cmpihost::PropertyList;
using cmpihost::Value;

const std::string kSystemName = "bbhost.example";
const std::string kNameSpace = "root/cimv2";

// The fixed tree: three lights (one degraded, one without status or alarm state) and a fan.
const char* const kTree =
    "{\"nodes\": ["
    "{\"type\": 26, \"path\": \"1.2\", \"description\": \"Blue Light\", \"status\": 1,"
    " \"properties\": {\"1\": 2}},"
    "{\"type\": 3, \"path\": \"0.1\", \"description\": \"Fan\", \"status\": 1},"
    "{\"type\": 26, \"path\": \"1.3\", \"description\": \"Blue Light\", \"status\": 20,"
    " \"properties\": {\"1\": 3}},"
    "{\"type\": 26, \"path\": \"1.4\", \"description\": \"Second Light\"}"
    "]}";

const std::vector<std::string> kDeviceIDs = {"Blue Light:1.2", "Blue Light:1.3",
                                             "Second Light:1.4"};

const std::vector<std::string> kNameSpaces = {"root/cimv2", "ROOT/CIMV2", "root/interop", "",
                                              "root/cimv2/"};

const std::vector<std::string> kClassNames = {"KESTA_BlueLight",
                                              "KESTA_BlueLightCapabilities",
                                              "KESTA_BlueLightElementCapabilities",
                                              "KESTA_BlueLightSystemDevice",
                                              "KESTA_ComputerSystem",
                                              "kesta_bluelight",
                                              "CIM_ManagedElement",
                                              "CIM_Capabilities",
                                              "CIM_ElementCapabilities",
                                              "CIM_SystemDevice",
                                              "CIM_LogicalDevice",
                                              "CIM_ComputerSystem",
                                              "CIM_System",
                                              "CIM_EnabledLogicalElementCapabilities",
                                              "KESTA_Fan",
                                              ""};

const std::vector<std::string> kKeyNames = {
    "CreationClassName", "DeviceID",     "SystemCreationClassName",
    "SystemName",        "InstanceID",   "Name",
    "ManagedElement",    "Capabilities", "GroupComponent",
    "PartComponent",     "deviceid",     ""};

const std::vector<std::string> kTexts = {"KESTA_BlueLight",
                                         "KESTA_ComputerSystem",
                                         "KESTA_BlueLightCapabilities",
                                         kSystemName,
                                         "BBHOST.EXAMPLE",
                                         "Blue Light:1.2",
                                         "Blue Light:1.3",
                                         "Second Light:1.4",
                                         "blue light:1.2",
                                         " Blue Light:1.2 ",
                                         "KESTA:BlueLightCapabilities1",
                                         "",
                                         " ",
                                         "Blue Light:",
                                         ":1.2"};

const std::vector<std::string> kPropertyNames = {"DeviceID",
                                                 "ElementName",
                                                 "AlarmState",
                                                 "OperationalStatus",
                                                 "HealthState",
                                                 "RequestedState",
                                                 "AudibleAlarm",
                                                 "VisibleAlarm",
                                                 "MotionAlarm",
                                                 "InstanceID",
                                                 "ManagedElement",
                                                 "Capabilities",
                                                 "GroupComponent",
                                                 "PartComponent",
                                                 "CreationClassName",
                                                 "SystemName",
                                                 "AlarmStatesSupported",
                                                 "Caption",
                                                 "Description",
                                                 "deviceid",
                                                 ""};

const std::vector<std::string> kFilterTexts = {"KESTA_BlueLightElementCapabilities",
                                               "KESTA_BlueLightSystemDevice",
                                               "CIM_ElementCapabilities",
                                               "CIM_SystemDevice",
                                               "KESTA_BlueLight",
                                               "KESTA_BlueLightCapabilities",
                                               "KESTA_ComputerSystem",
                                               "CIM_ManagedElement",
                                               "CIM_Capabilities",
                                               "CIM_LogicalDevice",
                                               "CIM_System",
                                               "ManagedElement",
                                               "Capabilities",
                                               "GroupComponent",
                                               "PartComponent",
                                               "kesta_bluelightsystemdevice",
                                               ""};

enum class Operation {
  EnumInstanceNames,
  EnumInstances,
  GetInstance,
  Associators,
  AssociatorNames,
  References,
  ReferenceNames
};

[[noreturn]] void fail(const char* what) {
  std::fprintf(stderr, "fuzz_operations: %s\n", what);
  std::abort();
}

// The tree files, removed when the fuzzer ends: the fixed tree, and a tree without nodes. A third
// source text names a file that does not exist.
std::string tree;
std::string emptyTree;
std::string treeSource;
std::string emptyTreeSource;
std::string missingTreeSource;

void writeFile(const std::string& file, const char* text) {
  std::FILE* out = std::fopen(file.c_str(), "wb");
  if (out == nullptr || std::fputs(text, out) < 0 || std::fclose(out) != 0) {
    fail("cannot write a tree file");
  }
}

std::string pick(FuzzedDataProvider& in, const std::vector<std::string>& words) {
  // One in four is a fuzzed text, the rest a known word.
  if (in.ConsumeIntegralInRange<int>(0, 3) == 0) return in.ConsumeRandomLengthString(64);
  return words[in.ConsumeIntegralInRange<std::size_t>(0, words.size() - 1)];
}

OptionalText pickOptional(FuzzedDataProvider& in, const std::vector<std::string>& words) {
  if (in.ConsumeBool()) return std::nullopt;
  return pick(in, words);
}

ObjectPathValue lightPath(const std::string& deviceID) {
  ObjectPathValue path(kNameSpace, "KESTA_BlueLight");
  path.addKey("CreationClassName", Value("KESTA_BlueLight"));
  path.addKey("DeviceID", Value(deviceID));
  path.addKey("SystemCreationClassName", Value("KESTA_ComputerSystem"));
  path.addKey("SystemName", Value(kSystemName));
  return path;
}

ObjectPathValue capabilitiesPath() {
  ObjectPathValue path(kNameSpace, "KESTA_BlueLightCapabilities");
  path.addKey("InstanceID", Value("KESTA:BlueLightCapabilities1"));
  return path;
}

ObjectPathValue systemPath(const std::string& name) {
  ObjectPathValue path(kNameSpace, "KESTA_ComputerSystem");
  path.addKey("CreationClassName", Value("KESTA_ComputerSystem"));
  path.addKey("Name", Value(name));
  return path;
}

ObjectPathValue freePath(FuzzedDataProvider& in, int depth);

Value anyValue(FuzzedDataProvider& in, int depth) {
  switch (in.ConsumeIntegralInRange<int>(0, 15)) {
    case 0:
      return Value::null(CMPI_string);
    case 1:
      return Value::null(static_cast<CMPIType>(in.ConsumeIntegral<std::uint16_t>()));
    case 2:
      return Value::uint16(in.ConsumeIntegral<std::uint16_t>());
    case 3:
      return Value::uint32(in.ConsumeIntegral<std::uint32_t>());
    case 4:
      return Value::sint64(in.ConsumeIntegral<std::int64_t>());
    case 5:
      return Value::boolean(in.ConsumeBool());
    case 6:
      return Value::real64(in.ConsumeFloatingPoint<double>());
    case 7:
      return Value::char16(in.ConsumeIntegral<std::uint16_t>());
    case 8:
      return Value::dateTime(in.ConsumeBool() ? "20240229120000.000000+060"
                                              : in.ConsumeRandomLengthString(32));
    case 9:
      if (depth < 2) return Value::reference(freePath(in, depth + 1));
      return Value::null(CMPI_ref);
    case 10: {
      std::vector<Value> elements;
      const int count = in.ConsumeIntegralInRange<int>(0, 3);
      for (int i = 0; i < count; ++i) elements.emplace_back(pick(in, kTexts));
      return Value::array(CMPI_string, std::move(elements));
    }
    case 11:
      return Value::uint8(in.ConsumeIntegral<std::uint8_t>());
    default:
      return Value(pick(in, kTexts));
  }
}

// A path made of fuzzed parts.
ObjectPathValue freePath(FuzzedDataProvider& in, int depth) {
  ObjectPathValue path(pick(in, kNameSpaces), pick(in, kClassNames));
  if (in.ConsumeIntegralInRange<int>(0, 7) == 0) path.setHost(pick(in, kTexts));
  const int keys = in.ConsumeIntegralInRange<int>(0, 5);
  for (int i = 0; i < keys; ++i) {
    std::string name = pick(in, kKeyNames);
    path.addKey(std::move(name), anyValue(in, depth));
  }
  return path;
}

// A path that names something the providers know, possibly with one part bent.
ObjectPathValue knownPath(FuzzedDataProvider& in) {
  ObjectPathValue path;
  switch (in.ConsumeIntegralInRange<int>(0, 6)) {
    case 0:
      path = lightPath(kDeviceIDs[in.ConsumeIntegralInRange<std::size_t>(0, 2)]);
      break;
    case 1:
      path = capabilitiesPath();
      break;
    case 2:
      path = systemPath(in.ConsumeBool() ? kSystemName : pick(in, kTexts));
      break;
    case 3:
      path = ObjectPathValue(kNameSpace, "KESTA_BlueLightElementCapabilities");
      path.addKey("ManagedElement",
                  Value(lightPath(kDeviceIDs[in.ConsumeIntegralInRange<std::size_t>(0, 2)])));
      path.addKey("Capabilities", Value(capabilitiesPath()));
      break;
    case 4:
      path = ObjectPathValue(kNameSpace, "KESTA_BlueLightSystemDevice");
      path.addKey("GroupComponent", Value(systemPath(kSystemName)));
      path.addKey("PartComponent",
                  Value(lightPath(kDeviceIDs[in.ConsumeIntegralInRange<std::size_t>(0, 2)])));
      break;
    case 5:
      path = lightPath(pick(in, kTexts));
      break;
    default:
      path = ObjectPathValue(kNameSpace, pick(in, kClassNames));
      break;
  }
  switch (in.ConsumeIntegralInRange<int>(0, 7)) {
    case 0:  // another namespace
      path.setNameSpace(pick(in, kNameSpaces));
      break;
    case 1:  // another class
      path.setClassName(pick(in, kClassNames));
      break;
    case 2:  // a key less
      if (!path.keys().empty()) {
        const std::size_t which = in.ConsumeIntegralInRange<std::size_t>(0, path.keys().size() - 1);
        path.removeKey(path.keys()[which].name);
      }
      break;
    case 3:  // a key of another value or type
      if (!path.keys().empty()) {
        const std::size_t which = in.ConsumeIntegralInRange<std::size_t>(0, path.keys().size() - 1);
        path.addKey(path.keys()[which].name, anyValue(in, 1));
      }
      break;
    case 4:  // a key more
      path.addKey(pick(in, kKeyNames), anyValue(in, 1));
      break;
    case 5:  // a host
      path.setHost(pick(in, kTexts));
      break;
    default:  // as it is
      break;
  }
  return path;
}

PropertyList propertyList(FuzzedDataProvider& in) {
  switch (in.ConsumeIntegralInRange<int>(0, 3)) {
    case 0:
      return std::nullopt;
    case 1:
      return std::vector<std::string>{};
    default: {
      std::vector<std::string> names;
      const int count = in.ConsumeIntegralInRange<int>(1, 5);
      for (int i = 0; i < count; ++i) names.push_back(pick(in, kPropertyNames));
      return names;
    }
  }
}

void configureUpcalls(FuzzedDataProvider& in, cmpihost::Broker& broker) {
  std::vector<std::string> names;
  switch (in.ConsumeIntegralInRange<int>(0, 8)) {
    case 0:
      broker.setUpcallFailure("KESTA_ComputerSystem", cmpihost::StatusValue{CMPI_RC_ERR_NOT_FOUND});
      return;
    case 1:
      break;  // no computer system at all
    case 2:
      names = {kSystemName, pick(in, kTexts)};
      break;
    case 3:
      names = {pick(in, kTexts)};
      break;
    case 4: {
      // A system that says nothing but its class: its path has no keys to take.
      cmpihost::InstanceValue system(ObjectPathValue(kNameSpace, "KESTA_ComputerSystem"));
      system.set("CreationClassName", Value("KESTA_ComputerSystem"));
      broker.setUpcallInstances("KESTA_ComputerSystem", {system});
      return;
    }
    default:
      names = {kSystemName};
      break;
  }
  std::vector<cmpihost::InstanceValue> systems;
  for (const std::string& name : names) {
    cmpihost::InstanceValue system(systemPath(name));
    system.set("CreationClassName", Value("KESTA_ComputerSystem"));
    system.set("Name", Value(name));
    systems.push_back(system);
  }
  broker.setUpcallInstances("KESTA_ComputerSystem", systems);
}

void armFault(FuzzedDataProvider& in, cmpihost::Broker& broker) {
  switch (in.ConsumeIntegralInRange<int>(0, 3)) {
    case 1: {
      const auto& functions = cmpihost::allCreatingFunctions();
      const cmpihost::CreatingFunction function =
          functions[in.ConsumeIntegralInRange<std::size_t>(0, functions.size() - 1)];
      const auto nth = in.ConsumeIntegralInRange<std::uint64_t>(1, 40);
      cmpihost::Fault fault;
      switch (in.ConsumeIntegralInRange<int>(0, 2)) {
        case 0:
          fault = cmpihost::Fault::nullResult(function, nth);
          break;
        case 1:
          fault = cmpihost::Fault::nullHandle(function, nth);
          break;
        default:
          fault = cmpihost::Fault::errorStatus(function, nth);
          break;
      }
      if (in.ConsumeBool()) fault = fault.fromThenOn();
      broker.armFault(fault);
      break;
    }
    case 2: {
      const auto& functions = cmpihost::allObjectFunctions();
      const cmpihost::ObjectFunction& function =
          functions[in.ConsumeIntegralInRange<std::size_t>(0, functions.size() - 1)];
      broker.armFault(cmpihost::Fault::invalidateHandle(
          function, in.ConsumeIntegralInRange<std::uint64_t>(1, 40)));
      break;
    }
    default:
      break;  // no fault
  }
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  // Every trace and log line is formatted, and thrown away.
  setenv("VNLOG_SINK", "file:/dev/null", 1);
  setenv("VNLOG_LEVEL", "0", 1);
  setenv("KESTA_SYSTEM_NAME", kSystemName.c_str(), 1);
  setenv("KESTA_LANGUAGE", "en", 1);
  const char* dir = std::getenv("TMPDIR");
  const std::string stem = std::string(dir != nullptr && *dir != '\0' ? dir : "/tmp") +
                           "/fuzz_operations." + std::to_string(getpid());
  tree = stem + ".json";
  emptyTree = stem + ".empty.json";
  writeFile(tree, kTree);
  writeFile(emptyTree, "{\"nodes\": []}");
  treeSource = "file:" + tree;
  emptyTreeSource = "file:" + emptyTree;
  missingTreeSource = "file:" + stem + ".missing.json";
  std::atexit([] {
    std::remove(tree.c_str());
    std::remove(emptyTree.c_str());
  });
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider in(data, size);

  cmpihost::BrokerOptions brokerOptions;
  brokerOptions.recording = false;
  cmpihost::Broker broker(brokerOptions);

  const int provider = in.ConsumeIntegralInRange<int>(0, 3);
  const auto operation = static_cast<Operation>(in.ConsumeIntegralInRange<int>(0, 6));
  const bool association = operation >= Operation::Associators;
  // Only two of the providers serve associations; an association operation goes to one of them.
  const int chosen = association ? 2 + (provider & 1) : provider;
  const bool nullBroker = in.ConsumeIntegralInRange<int>(0, 31) == 0;

  std::optional<ObjectPathValue> path;
  switch (in.ConsumeIntegralInRange<int>(0, 15)) {
    case 0:
      break;  // a null object path
    case 1:
    case 2:
    case 3:
    case 4:
      path = freePath(in, 0);
      break;
    default:
      path = knownPath(in);
      break;
  }
  const PropertyList properties = propertyList(in);
  const OptionalText assocClass = pickOptional(in, kFilterTexts);
  const OptionalText resultClass = pickOptional(in, kFilterTexts);
  const OptionalText role = pickOptional(in, kFilterTexts);
  const OptionalText resultRole = pickOptional(in, kFilterTexts);
  cmpihost::RequestOptions options;
  if (in.ConsumeIntegralInRange<int>(0, 7) == 0) options.nameSpace = pick(in, kNameSpaces);
  if (in.ConsumeIntegralInRange<int>(0, 7) == 0) options.principal = std::nullopt;
  if (in.ConsumeIntegralInRange<int>(0, 7) == 0) {
    options.invocationFlags = in.ConsumeIntegral<std::uint8_t>();
  }
  configureUpcalls(in, broker);
  armFault(in, broker);
  // The instrumentation reads its source at every operation; most inputs get the fixed tree.
  switch (in.ConsumeIntegralInRange<int>(0, 15)) {
    case 0:
      setenv("KESTA_INSTRUMENTATION", emptyTreeSource.c_str(), 1);
      break;
    case 1:
      setenv("KESTA_INSTRUMENTATION", missingTreeSource.c_str(), 1);
      break;
    default:
      setenv("KESTA_INSTRUMENTATION", treeSource.c_str(), 1);
      break;
  }

  const CMPIBroker* const handed = nullBroker ? nullptr : broker.cmpi();
  const cmpihost::Outcome outcome = cmpihost::run(
      broker,
      [&](cmpihost::Request& request) -> CMPIStatus {
        CMPIStatus created{CMPI_RC_OK, nullptr};
        const CMPIContext* context = request.context();
        const CMPIResult* result = request.result();
        const CMPIObjectPath* reference = path ? request.objectPath(*path) : nullptr;
        const char** list = request.propertyList(properties);
        if (association) {
          CMPIAssociationMI* mi =
              chosen == 2
                  ? BlueLightElementCapabilitiesProvider_Create_AssociationMI(handed, context,
                                                                              &created)
                  : BlueLightSystemDeviceProvider_Create_AssociationMI(handed, context, &created);
          if (mi == nullptr || mi->ft == nullptr) fail("an association MI factory gave nothing");
          switch (operation) {
            case Operation::Associators:
              return mi->ft->associators(mi, context, result, reference, request.text(assocClass),
                                         request.text(resultClass), request.text(role),
                                         request.text(resultRole), list);
            case Operation::AssociatorNames:
              return mi->ft->associatorNames(mi, context, result, reference,
                                             request.text(assocClass), request.text(resultClass),
                                             request.text(role), request.text(resultRole));
            case Operation::References:
              return mi->ft->references(mi, context, result, reference, request.text(resultClass),
                                        request.text(role), list);
            default:
              return mi->ft->referenceNames(mi, context, result, reference,
                                            request.text(resultClass), request.text(role));
          }
        }
        CMPIInstanceMI* mi = nullptr;
        switch (chosen) {
          case 0:
            mi = BlueLightProfileProvider_Create_InstanceMI(handed, context, &created);
            break;
          case 1:
            mi = BlueLightCapabilitiesProvider_Create_InstanceMI(handed, context, &created);
            break;
          case 2:
            mi = BlueLightElementCapabilitiesProvider_Create_InstanceMI(handed, context, &created);
            break;
          default:
            mi = BlueLightSystemDeviceProvider_Create_InstanceMI(handed, context, &created);
            break;
        }
        if (mi == nullptr || mi->ft == nullptr) fail("an instance MI factory gave nothing");
        switch (operation) {
          case Operation::EnumInstanceNames:
            return mi->ft->enumerateInstanceNames(mi, context, result, reference);
          case Operation::EnumInstances:
            return mi->ft->enumerateInstances(mi, context, result, reference, list);
          default:
            return mi->ft->getInstance(mi, context, result, reference, list);
        }
      },
      options);

  if (outcome.doneCount > 1) fail("returnDone was called more than once");
  if (broker.brokerOwnedObjectCount() != 0) fail("objects were made outside the request");
  return 0;
}
