#include "ReliabilityWorkload.h"

#include <dirent.h>
#include <sys/resource.h>

#include <chrono>
#include <fstream>
#include <sstream>
#include <stdexcept>

namespace reliability {

namespace {

using cmpihost::Broker;
using cmpihost::ObjectPathValue;
using cmpihost::Outcome;
using cmpihost::Value;

const char* const kLightClass = "KESTA_BlueLight";
const char* const kCapabilitiesClass = "KESTA_BlueLightCapabilities";
const char* const kElementCapabilitiesClass = "KESTA_BlueLightElementCapabilities";
const char* const kSystemDeviceClass = "KESTA_BlueLightSystemDevice";
const char* const kComputerSystemClass = "KESTA_ComputerSystem";

std::vector<testsupport::Node> worldTree() {
  testsupport::Node temperature;
  temperature.type = 7;
  temperature.path = "0.2";
  temperature.description = "Temperature";
  return {testsupport::blueLight("1.1", 1u, 2u), testsupport::blueLight("1.2", 1u, 1u), temperature,
          testsupport::blueLight("1.3", std::nullopt, 3u),
          testsupport::blueLight("2.1", 2u, std::nullopt, "  Blue Light  ")};
}

std::string writeWorldTree(const testsupport::TempDir& dir) {
  std::string file = dir.file("tree.json");
  testsupport::writeTree(file, worldTree());
  return file;
}

ObjectPathValue classPath(const std::string& className) {
  return ObjectPathValue(kNameSpace, className);
}

ObjectPathValue lightPath(const std::string& deviceID) {
  ObjectPathValue path(kNameSpace, kLightClass);
  path.addKey("CreationClassName", Value(kLightClass));
  path.addKey("DeviceID", Value(deviceID));
  path.addKey("SystemCreationClassName", Value(kComputerSystemClass));
  path.addKey("SystemName", Value(kSystemName));
  return path;
}

ObjectPathValue capabilitiesPath() {
  ObjectPathValue path(kNameSpace, kCapabilitiesClass);
  path.addKey("InstanceID", Value("KESTA:BlueLightCapabilities1"));
  return path;
}

ObjectPathValue computerSystemPath(const std::string& name) {
  ObjectPathValue path(kNameSpace, kComputerSystemClass);
  path.addKey("CreationClassName", Value(kComputerSystemClass));
  path.addKey("Name", Value(name));
  return path;
}

// The first path an EnumInstanceNames hands over, as a client would send it back.
ObjectPathValue firstName(Broker& broker, CMPIInstanceMI* mi, const std::string& className) {
  const Outcome outcome = cmpihost::enumerateInstanceNames(broker, mi, classPath(className));
  const std::vector<ObjectPathValue> paths = outcome.paths();
  if (!outcome.status.ok() || paths.empty()) {
    throw std::runtime_error("EnumInstanceNames of " + className +
                             " gave no path: " + outcome.status.toString());
  }
  return paths.front();
}

// The instance operations of one class.
void addInstanceOperations(std::vector<Operation>& operations, const std::string& className,
                           CMPIInstanceMI* ProviderMIs::*mi, const ObjectPathValue& existing,
                           const std::vector<std::string>& someProperties) {
  const ObjectPathValue all = classPath(className);
  operations.push_back(
      {className + " EnumInstanceNames", [all, mi](Broker& b, const ProviderMIs& m) {
         return cmpihost::enumerateInstanceNames(b, m.*mi, all);
       }});
  operations.push_back({className + " EnumInstances", [all, mi](Broker& b, const ProviderMIs& m) {
                          return cmpihost::enumerateInstances(b, m.*mi, all);
                        }});
  operations.push_back({className + " EnumInstances with a property list",
                        [all, mi, someProperties](Broker& b, const ProviderMIs& m) {
                          return cmpihost::enumerateInstances(b, m.*mi, all, someProperties);
                        }});
  operations.push_back({className + " GetInstance " + existing.toString(),
                        [existing, mi](Broker& b, const ProviderMIs& m) {
                          return cmpihost::getInstance(b, m.*mi, existing);
                        }});
}

// The four association operations from one end.
void addAssociationOperations(std::vector<Operation>& operations, const std::string& className,
                              CMPIAssociationMI* ProviderMIs::*mi, const ObjectPathValue& end) {
  const std::string at = className + " from " + end.className() + " ";
  operations.push_back({at + "Associators", [end, mi](Broker& b, const ProviderMIs& m) {
                          return cmpihost::associators(b, m.*mi, end);
                        }});
  operations.push_back({at + "AssociatorNames", [end, mi](Broker& b, const ProviderMIs& m) {
                          return cmpihost::associatorNames(b, m.*mi, end);
                        }});
  operations.push_back({at + "References", [end, mi](Broker& b, const ProviderMIs& m) {
                          return cmpihost::references(b, m.*mi, end);
                        }});
  operations.push_back({at + "ReferenceNames", [end, mi](Broker& b, const ProviderMIs& m) {
                          return cmpihost::referenceNames(b, m.*mi, end);
                        }});
}

long readStatusKiB(const std::string& field) {
  std::ifstream status("/proc/self/status");
  std::string line;
  while (std::getline(status, line)) {
    if (line.compare(0, field.size() + 1, field + ":") == 0) {
      std::istringstream values(line.substr(field.size() + 1));
      long kib = 0;
      values >> kib;
      return kib;
    }
  }
  return -1;
}

int countEntries(const char* directory) {
  DIR* dir = ::opendir(directory);
  if (dir == nullptr) return -1;
  int count = 0;
  while (const dirent* entry = ::readdir(dir)) {
    const std::string name = entry->d_name;
    if (name != "." && name != "..") ++count;
  }
  ::closedir(dir);
  return count;
}

}  // namespace

World::World()
    : systemName_("KESTA_SYSTEM_NAME", kSystemName),
      language_("KESTA_LANGUAGE", std::string("en")),
      source_("KESTA_INSTRUMENTATION", "file:" + writeWorldTree(dir_)),
      sink_("VNLOG_SINK", std::string("file:/dev/null")),
      level_("VNLOG_LEVEL", std::string("0")) {}

void World::configure(Broker& broker) {
  std::vector<cmpihost::InstanceValue> systems;
  for (const std::string& name : {kSystemName, kPeerSystemName}) {
    cmpihost::InstanceValue system(computerSystemPath(name));
    system.set("CreationClassName", Value(kComputerSystemClass));
    system.set("Name", Value(name));
    systems.push_back(system);
  }
  broker.setUpcallInstances(kComputerSystemClass, systems);
}

ProviderMIs createMIs(const cmpihost::ProviderLibrary& library, Broker& broker) {
  cmpihost::Request request(broker);
  ProviderMIs mis;
  auto instance = [&](const char* provider) {
    cmpihost::InstanceMILoad load = cmpihost::createInstanceMI(library, provider, broker, request);
    if (!load.ok()) throw std::runtime_error(std::string(provider) + ": " + load.error);
    return load.mi;
  };
  auto association = [&](const char* provider) {
    cmpihost::AssociationMILoad load =
        cmpihost::createAssociationMI(library, provider, broker, request);
    if (!load.ok()) throw std::runtime_error(std::string(provider) + ": " + load.error);
    return load.mi;
  };
  mis.light = instance("BlueLightProfileProvider");
  mis.capabilities = instance("BlueLightCapabilitiesProvider");
  mis.elementCapabilities = instance("BlueLightElementCapabilitiesProvider");
  mis.elementCapabilitiesAssociation = association("BlueLightElementCapabilitiesProvider");
  mis.systemDevice = instance("BlueLightSystemDeviceProvider");
  mis.systemDeviceAssociation = association("BlueLightSystemDeviceProvider");
  return mis;
}

void cleanupMIs(Broker& broker, const ProviderMIs& mis) {
  std::vector<Outcome> outcomes = {cmpihost::cleanup(broker, mis.light),
                                   cmpihost::cleanup(broker, mis.capabilities),
                                   cmpihost::cleanup(broker, mis.elementCapabilities),
                                   cmpihost::cleanup(broker, mis.elementCapabilitiesAssociation),
                                   cmpihost::cleanup(broker, mis.systemDevice),
                                   cmpihost::cleanup(broker, mis.systemDeviceAssociation)};
  for (const Outcome& outcome : outcomes) {
    if (!outcome.status.ok()) throw std::runtime_error("cleanup: " + outcome.status.toString());
  }
}

std::vector<Operation> readOperations(Broker& broker, const ProviderMIs& mis) {
  std::vector<Operation> operations;
  addInstanceOperations(operations, kLightClass, &ProviderMIs::light, lightPath("Blue Light:1.2"),
                        {"ElementName", "AlarmState"});
  const ObjectPathValue missing = lightPath("Blue Light:9.9");
  operations.push_back({std::string(kLightClass) + " GetInstance of a missing light",
                        [missing](Broker& b, const ProviderMIs& m) {
                          return cmpihost::getInstance(b, m.light, missing);
                        }});
  // A failure: status message and broker trace made on the failing thread.
  const ObjectPathValue keyless = classPath(kLightClass);
  operations.push_back({std::string(kLightClass) + " GetInstance without keys",
                        [keyless](Broker& b, const ProviderMIs& m) {
                          return cmpihost::getInstance(b, m.light, keyless);
                        }});
  addInstanceOperations(operations, kCapabilitiesClass, &ProviderMIs::capabilities,
                        capabilitiesPath(), {"ElementName"});
  addInstanceOperations(operations, kElementCapabilitiesClass, &ProviderMIs::elementCapabilities,
                        firstName(broker, mis.elementCapabilities, kElementCapabilitiesClass),
                        {"ManagedElement"});
  addInstanceOperations(operations, kSystemDeviceClass, &ProviderMIs::systemDevice,
                        firstName(broker, mis.systemDevice, kSystemDeviceClass),
                        {"GroupComponent"});

  addAssociationOperations(operations, kElementCapabilitiesClass,
                           &ProviderMIs::elementCapabilitiesAssociation,
                           lightPath("Blue Light:1.1"));
  addAssociationOperations(operations, kElementCapabilitiesClass,
                           &ProviderMIs::elementCapabilitiesAssociation, capabilitiesPath());
  addAssociationOperations(operations, kSystemDeviceClass, &ProviderMIs::systemDeviceAssociation,
                           computerSystemPath(kSystemName));
  addAssociationOperations(operations, kSystemDeviceClass, &ProviderMIs::systemDeviceAssociation,
                           lightPath("Blue Light:1.3"));

  // A result class and the association class named, as a client may send them.
  const ObjectPathValue light = lightPath("Blue Light:2.1");
  operations.push_back({"KESTA_BlueLightElementCapabilities Associators with result class",
                        [light](Broker& b, const ProviderMIs& m) {
                          return cmpihost::associators(b, m.elementCapabilitiesAssociation, light,
                                                       std::string(kElementCapabilitiesClass),
                                                       std::string(kCapabilitiesClass));
                        }});
  const ObjectPathValue system = computerSystemPath(kPeerSystemName);
  operations.push_back({"KESTA_BlueLightSystemDevice AssociatorNames with result class",
                        [system](Broker& b, const ProviderMIs& m) {
                          return cmpihost::associatorNames(b, m.systemDeviceAssociation, system,
                                                           std::string(kSystemDeviceClass),
                                                           std::string(kLightClass));
                        }});
  return operations;
}

std::vector<Operation> oneOperationPerMI() {
  std::vector<Operation> operations;
  const std::pair<const char*, CMPIInstanceMI * ProviderMIs::*> classes[] = {
      {kLightClass, &ProviderMIs::light},
      {kCapabilitiesClass, &ProviderMIs::capabilities},
      {kElementCapabilitiesClass, &ProviderMIs::elementCapabilities},
      {kSystemDeviceClass, &ProviderMIs::systemDevice}};
  for (const auto& [className, mi] : classes) {
    const ObjectPathValue all = classPath(className);
    operations.push_back({std::string(className) + " EnumInstances",
                          [all, mi = mi](Broker& b, const ProviderMIs& m) {
                            return cmpihost::enumerateInstances(b, m.*mi, all);
                          }});
  }
  const ObjectPathValue light = lightPath("Blue Light:1.1");
  operations.push_back({"KESTA_BlueLightElementCapabilities AssociatorNames",
                        [light](Broker& b, const ProviderMIs& m) {
                          return cmpihost::associatorNames(b, m.elementCapabilitiesAssociation,
                                                           light);
                        }});
  const ObjectPathValue system = computerSystemPath(kSystemName);
  operations.push_back(
      {"KESTA_BlueLightSystemDevice References", [system](Broker& b, const ProviderMIs& m) {
         return cmpihost::references(b, m.systemDeviceAssociation, system);
       }});
  return operations;
}

std::string render(const Outcome& outcome) {
  std::string text = "status " + outcome.status.toString() + "\n";
  text += "done " + std::to_string(outcome.doneCount) + "\n";
  for (const cmpihost::ResultEvent& event : outcome.results) {
    text += std::string(cmpihost::toString(event.kind));
    if (event.state != cmpihost::ObjectState::Valid) {
      text += std::string(" ") + cmpihost::toString(event.state);
    } else if (event.kind != cmpihost::ResultKind::Done &&
               event.kind != cmpihost::ResultKind::Error) {
      text += " " + event.value.toString();
    }
    text += "\n";
  }
  for (const cmpihost::TraceRecord& trace : outcome.traces) {
    text += "trace " + std::to_string(trace.level) + " " + trace.component.value_or("(null)") +
            ": " + trace.text.value_or("(null)") + "\n";
  }
  return text;
}

std::size_t handedOver(const Outcome& outcome) {
  return outcome.count(cmpihost::ResultKind::Instance) +
         outcome.count(cmpihost::ResultKind::ObjectPath);
}

ProcessFigures measure() {
  ProcessFigures figures;
  figures.residentKiB = readStatusKiB("VmRSS");
  // One entry is the descriptor opendir() holds while reading.
  figures.openFds = countEntries("/proc/self/fd") - 1;
  figures.threads = countEntries("/proc/self/task");
  return figures;
}

bool isMapped(const std::string& name) {
  std::ifstream maps("/proc/self/maps");
  std::string line;
  while (std::getline(maps, line)) {
    if (line.find(name) != std::string::npos) return true;
  }
  return false;
}

bool underValgrind() { return isMapped("/vgpreload_"); }

double now() {
  using Clock = std::chrono::steady_clock;
  return std::chrono::duration<double>(Clock::now().time_since_epoch()).count();
}

double cpuSeconds() {
  rusage usage{};
  ::getrusage(RUSAGE_SELF, &usage);
  auto seconds = [](const timeval& t) {
    return static_cast<double>(t.tv_sec) + static_cast<double>(t.tv_usec) / 1e6;
  };
  return seconds(usage.ru_utime) + seconds(usage.ru_stime);
}

}  // namespace reliability
