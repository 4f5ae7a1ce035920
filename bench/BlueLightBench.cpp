// Benchmarks of the provider library as an object manager drives it: the library is loaded with
// dlopen into the in-process host and its operations are called through the MI tables. Next to
// them run the two costs that no provider can avoid, measured in the same process:
//
//   floor  the host creating the same object paths and instances with the same properties
//          through its broker tables, and handing them to the result (what a minimal provider
//          makes the object manager spend);
//   walk   the platform opening an instrumentation cursor on the same JSON tree and walking its
//          nodes (what reading the hardware costs).
//
// Beside them the snapshot parser (parseNodeSnapshot) is measured on its own, on the text of
// Walk/4096's tree (4,608 nodes) and of a tree of 65,537 nodes, and the walk of the server's own
// hardware classes (Walk.EnclosureLeds/N): an enclosure class of two enclosures of 24 or 96 bays
// and an LED class, laid out as the kernel lays them out, on tmpfs; and auto finding the same
// classes under a discovery root (Walk.Auto/50).
//
// The provider's logger reads VNLOG_SINK and VNLOG_LEVEL once per process, so the program runs
// itself twice: once with the sink "none" and once with every line written to a file. Each run
// measures the floor and the walk again, so every ratio compares figures taken side by side. The
// parent prints the table and the ratios against the targets.
//
//   bluelight-bench [google-benchmark options] [--bench-library=<so>] [--bench-growth-ops=<n>]
//                   [--bench-sinks=none,file]
//
// BENCH_STRICT=1 makes the exit status non-zero when a ratio misses its target.
#include <benchmark/benchmark.h>
#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iomanip>
#include <iostream>
#include <map>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "AllocCounter.h"
#include "KestaInstrumentation.h"
#include "cmpihost/cmpihost.h"
#include "instrumentation/enclosure/EnclosureSource.h"
#include "instrumentation/json/SnapshotParser.h"
#include "instrumentation/leds/SysfsLedSource.h"

namespace {

const std::vector<int> kLightCounts = {1, 16, 256, 4096};
constexpr int kAssociationLights = 256;
// Walk.EnclosureLeds: two enclosures of this many bays, and the LED class's blue lights.
constexpr int kEnclosureSlots = 24;
constexpr int kEnclosureSlotsLarge = 96;
constexpr int kBlueLeds = 2;
const std::string kSystemName = "bbhost.example";
const std::string kNameSpace = "root/cimv2";

// ---------------------------------------------------------------------------------------------
// Options of one run
// ---------------------------------------------------------------------------------------------

struct Options {
  std::string library = BLUELIGHT_PROVIDER_LIBRARY;
  std::string sink;         // "none" or "file" in a child; empty in the parent
  std::string resultsFile;  // where a child writes its figures
  std::string sinks = "none,file";
  long growthOps = 10000;
  std::vector<std::string> benchmarkArgs;  // passed on to Google Benchmark
};

bool takeOption(const std::string& argument, const std::string& name, std::string& value) {
  const std::string prefix = "--" + name + "=";
  if (argument.compare(0, prefix.size(), prefix) != 0) return false;
  value = argument.substr(prefix.size());
  return true;
}

Options parseOptions(int argc, char** argv) {
  Options options;
  for (int i = 1; i < argc; ++i) {
    const std::string argument = argv[i];
    std::string value;
    if (takeOption(argument, "bench-library", value)) {
      options.library = value;
    } else if (takeOption(argument, "bench-child", value)) {
      options.sink = value;
    } else if (takeOption(argument, "bench-results", value)) {
      options.resultsFile = value;
    } else if (takeOption(argument, "bench-sinks", value)) {
      options.sinks = value;
    } else if (takeOption(argument, "bench-growth-ops", value)) {
      options.growthOps = std::stol(value);
    } else {
      options.benchmarkArgs.push_back(argument);
    }
  }
  return options;
}

// ---------------------------------------------------------------------------------------------
// Trees
// ---------------------------------------------------------------------------------------------

std::string scratchDirectory() {
  static const std::string directory = [] {
    const char* base = std::getenv("TMPDIR");
    std::string pattern =
        std::string(base != nullptr && *base != '\0' ? base : "/tmp") + "/bluelight-bench.XXXXXX";
    if (::mkdtemp(pattern.data()) == nullptr) throw std::runtime_error("mkdtemp failed");
    return pattern;
  }();
  return directory;
}

// The DeviceID the provider makes of light `index` of a tree.
std::string deviceIDOf(int index) { return "Blue Light:1." + std::to_string(index + 1); }

// A tree of `count` blue lights with a mix of node statuses and alarm states, and a few nodes of
// other types in between that the provider skips, as in a real tree.
std::string treeFile(int count) {
  std::string file = scratchDirectory() + "/tree-" + std::to_string(count) + ".json";
  std::ofstream out(file);
  out << "{\"nodes\": [\n";
  const unsigned statuses[] = {1, 1, 1, 20, 24, 0};
  for (int i = 0; i < count; ++i) {
    if (i % 8 == 7) {
      out << "  {\"type\": 7, \"path\": \"0." << i << "\", \"description\": \"Temperature\","
          << " \"status\": 1},\n";
    }
    out << "  {\"type\": 26, \"path\": \"1." << (i + 1) << "\", \"description\": \"Blue Light\"";
    const unsigned status = statuses[i % 6];
    if (status != 0) out << ", \"status\": " << status;
    out << ", \"properties\": {\"1\": " << (1 + i % 3) << "}}" << (i + 1 < count ? "," : "")
        << "\n";
  }
  out << "]}\n";
  if (!out) throw std::runtime_error("cannot write " + file);
  return file;
}

void useTree(int count) {
  static std::map<int, std::string> files;
  auto found = files.find(count);
  if (found == files.end()) found = files.emplace(count, treeFile(count)).first;
  ::setenv("KESTA_INSTRUMENTATION", ("file:" + found->second).c_str(), 1);
}

// ---------------------------------------------------------------------------------------------
// The provider, loaded once per process
// ---------------------------------------------------------------------------------------------

struct Provider {
  explicit Provider(const std::string& path) : library(path) {
    cmpihost::Request request(broker);
    lights = load(cmpihost::createInstanceMI(library, "BlueLightProfileProvider", broker, request));
    elementCapabilities = load(cmpihost::createAssociationMI(
        library, "BlueLightElementCapabilitiesProvider", broker, request));
    systemDevice = load(
        cmpihost::createAssociationMI(library, "BlueLightSystemDeviceProvider", broker, request));
    cmpihost::InstanceValue system(computerSystemPath());
    system.set("CreationClassName", cmpihost::Value("KESTA_ComputerSystem"));
    system.set("Name", cmpihost::Value(kSystemName));
    broker.setUpcallInstances("KESTA_ComputerSystem", {system});
  }

  template <typename MI>
  static MI* load(const cmpihost::MILoadResult<MI>& result) {
    if (!result.ok()) throw std::runtime_error(result.error);
    return result.mi;
  }

  static cmpihost::ObjectPathValue computerSystemPath() {
    cmpihost::ObjectPathValue path(kNameSpace, "KESTA_ComputerSystem");
    path.addKey("CreationClassName", cmpihost::Value("KESTA_ComputerSystem"));
    path.addKey("Name", cmpihost::Value(kSystemName));
    return path;
  }

  // A broker that records nothing: what an object manager keeps of an operation is its result.
  cmpihost::Broker broker{cmpihost::BrokerOptions{
      "cmpihost", 200, CMPI_MB_Class_0 | CMPI_MB_Supports_MemEnhancements, false}};
  cmpihost::ProviderLibrary library;
  CMPIInstanceMI* lights = nullptr;
  CMPIAssociationMI* elementCapabilities = nullptr;
  CMPIAssociationMI* systemDevice = nullptr;
};

Options options;
std::unique_ptr<Provider> provider;

cmpihost::ObjectPathValue lightClassPath() {
  return cmpihost::ObjectPathValue(kNameSpace, "KESTA_BlueLight");
}

cmpihost::ObjectPathValue lightPath(int index) {
  cmpihost::ObjectPathValue path = lightClassPath();
  path.addKey("CreationClassName", cmpihost::Value("KESTA_BlueLight"));
  path.addKey("DeviceID", cmpihost::Value(deviceIDOf(index)));
  path.addKey("SystemCreationClassName", cmpihost::Value("KESTA_ComputerSystem"));
  path.addKey("SystemName", cmpihost::Value(kSystemName));
  return path;
}

cmpihost::ObjectPathValue capabilitiesPath() {
  cmpihost::ObjectPathValue path(kNameSpace, "KESTA_BlueLightCapabilities");
  path.addKey("InstanceID", cmpihost::Value("KESTA:BlueLightCapabilities1"));
  return path;
}

// ---------------------------------------------------------------------------------------------
// The log file of the "file" run
// ---------------------------------------------------------------------------------------------

std::string logFile() { return scratchDirectory() + "/provider.log"; }

// The log would grow by megabytes per operation; it is cut back now and then. The logger appends,
// so it simply carries on at the new end.
void trimLog() {
  if (options.sink != "file") return;
  static unsigned calls = 0;
  if (++calls % 16 != 0) return;
  struct stat info = {};
  if (::stat(logFile().c_str(), &info) == 0 && info.st_size > (64 << 20)) {
    if (::truncate(logFile().c_str(), 0) != 0) std::perror("truncate");
  }
}

// ---------------------------------------------------------------------------------------------
// The operations
// ---------------------------------------------------------------------------------------------

using Operation = std::function<std::size_t()>;  // returns the number of objects handed over

std::size_t handedOver(const cmpihost::Outcome& outcome) {
  if (outcome.status.rc != CMPI_RC_OK) {
    throw std::runtime_error("operation failed with rc " + std::to_string(outcome.status.rc));
  }
  return outcome.count(cmpihost::ResultKind::Instance) +
         outcome.count(cmpihost::ResultKind::ObjectPath);
}

Operation enumerateInstances() {
  return [] {
    return handedOver(
        cmpihost::enumerateInstances(provider->broker, provider->lights, lightClassPath()));
  };
}

Operation enumerateInstanceNames() {
  return [] {
    return handedOver(
        cmpihost::enumerateInstanceNames(provider->broker, provider->lights, lightClassPath()));
  };
}

Operation getInstance(int count) {
  const cmpihost::ObjectPathValue path = lightPath(count / 2);
  return [path] {
    return handedOver(cmpihost::getInstance(provider->broker, provider->lights, path));
  };
}

Operation associators(CMPIAssociationMI* Provider::*mi, const cmpihost::ObjectPathValue& source,
                      const std::string& association) {
  return [mi, source, association] {
    return handedOver(
        cmpihost::associators(provider->broker, (*provider).*mi, source, association));
  };
}

Operation references(CMPIAssociationMI* Provider::*mi, const cmpihost::ObjectPathValue& source,
                     const std::string& association) {
  return [mi, source, association] {
    return handedOver(cmpihost::references(provider->broker, (*provider).*mi, source, association));
  };
}

// The floor: the calls that any provider of N lights must make, served by the host. The texts
// are made up front, as a provider that kept its data at hand would have them.
struct FloorData {
  std::vector<std::string> deviceIDs;
  std::vector<CMPIUint16> healthStates;
  std::vector<CMPIUint16> alarmStates;
};

FloorData floorData(int count) {
  FloorData data;
  for (int i = 0; i < count; ++i) {
    data.deviceIDs.push_back(deviceIDOf(i));
    data.healthStates.push_back(static_cast<CMPIUint16>(i % 2 == 0 ? 5 : 10));
    data.alarmStates.push_back(static_cast<CMPIUint16>(1 + i % 3));
  }
  return data;
}

CMPIObjectPath* floorPath(const CMPIBroker* broker, const char* nameSpace,
                          const std::string& deviceID) {
  CMPIObjectPath* path = CMNewObjectPath(broker, nameSpace, "KESTA_BlueLight", nullptr);
  CMSetHostname(path, kSystemName.c_str());
  CMAddKey(path, "CreationClassName", "KESTA_BlueLight", CMPI_chars);
  CMAddKey(path, "DeviceID", deviceID.c_str(), CMPI_chars);
  CMAddKey(path, "SystemCreationClassName", "KESTA_ComputerSystem", CMPI_chars);
  CMAddKey(path, "SystemName", kSystemName.c_str(), CMPI_chars);
  return path;
}

Operation floorInstances(int count) {
  auto data = std::make_shared<FloorData>(floorData(count));
  return [data] {
    const cmpihost::Outcome outcome =
        cmpihost::run(provider->broker, [&](cmpihost::Request& request) {
          const CMPIBroker* broker = provider->broker.cmpi();
          for (std::size_t i = 0; i < data->deviceIDs.size(); ++i) {
            const std::string& deviceID = data->deviceIDs[i];
            // The instance takes its keys from its key properties, so its path needs none.
            CMPIObjectPath* path =
                CMNewObjectPath(broker, kNameSpace.c_str(), "KESTA_BlueLight", nullptr);
            CMSetHostname(path, kSystemName.c_str());
            CMPIInstance* instance = CMNewInstance(broker, path, nullptr);
            CMSetProperty(instance, "CreationClassName", "KESTA_BlueLight", CMPI_chars);
            CMSetProperty(instance, "DeviceID", deviceID.c_str(), CMPI_chars);
            CMSetProperty(instance, "SystemCreationClassName", "KESTA_ComputerSystem", CMPI_chars);
            CMSetProperty(instance, "SystemName", kSystemName.c_str(), CMPI_chars);
            CMSetProperty(instance, "Caption", "Blue Light", CMPI_chars);
            CMSetProperty(instance, "Description", "Blue Light", CMPI_chars);
            CMSetProperty(instance, "Name", "Blue Light", CMPI_chars);
            CMSetProperty(instance, "ElementName", "Blue Light", CMPI_chars);
            CMPIUint16 requested = 2;
            CMSetProperty(instance, "RequestedState", &requested, CMPI_uint16);
            CMSetProperty(instance, "HealthState", &data->healthStates[i], CMPI_uint16);
            CMPIArray* status = CMNewArray(broker, 2, CMPI_uint16, nullptr);
            CMPIUint16 ok = 2;
            CMPIUint16 inService = 11;
            CMSetArrayElementAt(status, 0, &ok, CMPI_uint16);
            CMSetArrayElementAt(status, 1, &inService, CMPI_uint16);
            CMSetProperty(instance, "OperationalStatus", &status, CMPI_uint16A);
            CMPIBoolean no = 0;
            CMPIBoolean yes = 1;
            CMSetProperty(instance, "AudibleAlarm", &no, CMPI_boolean);
            CMSetProperty(instance, "VisibleAlarm", &yes, CMPI_boolean);
            CMSetProperty(instance, "MotionAlarm", &no, CMPI_boolean);
            CMSetProperty(instance, "AlarmState", &data->alarmStates[i], CMPI_uint16);
            CMReturnInstance(request.result(), instance);
          }
          CMReturnDone(request.result());
          return CMPIStatus{CMPI_RC_OK, nullptr};
        });
    return handedOver(outcome);
  };
}

Operation floorNames(int count) {
  auto data = std::make_shared<FloorData>(floorData(count));
  return [data] {
    const cmpihost::Outcome outcome =
        cmpihost::run(provider->broker, [&](cmpihost::Request& request) {
          const CMPIBroker* broker = provider->broker.cmpi();
          for (const std::string& deviceID : data->deviceIDs) {
            CMReturnObjectPath(request.result(), floorPath(broker, kNameSpace.c_str(), deviceID));
          }
          CMReturnDone(request.result());
          return CMPIStatus{CMPI_RC_OK, nullptr};
        });
    return handedOver(outcome);
  };
}

// Reads every light of an open cursor as the provider does; returns their number.
std::size_t walkLights(Kesta::Instrumentation& cursor) {
  std::size_t lights = 0;
  cursor.selectNode(Kesta::NodeLexicon::NODE_TYPE_BLUE_LIGHT);
  while (cursor) {
    std::string path = cursor.getPathToNode();
    std::string description = cursor.getNodeDescription();
    unsigned int status = cursor.getNodeStatus();
    unsigned int alarmState = 0;
    cursor.getProperty(Kesta::NodeLexicon::PROPERTY_ALARM_STATE, alarmState);
    benchmark::DoNotOptimize(path);
    benchmark::DoNotOptimize(description);
    benchmark::DoNotOptimize(status);
    benchmark::DoNotOptimize(alarmState);
    ++lights;
    ++cursor;
  }
  return lights;
}

// The walk: what the platform costs to read the tree, the same way the provider reads it.
Operation walk() {
  return [] {
    Kesta::Instrumentation cursor;
    return walkLights(cursor);
  };
}

// ---------------------------------------------------------------------------------------------
// The hardware classes: enclosures and LEDs
// ---------------------------------------------------------------------------------------------

// Where the class trees are written: tmpfs, which is what sysfs is closest to (in memory, no
// disk, no page cache to warm). /dev/shm when it is writable, else the scratch directory. The
// child that made it removes it (removeHardwareTrees).
std::string hardwareDirectory() {
  static const std::string directory = [] {
    std::string pattern = "/dev/shm/bluelight-bench.XXXXXX";
    if (::access("/dev/shm", W_OK) == 0 && ::mkdtemp(pattern.data()) != nullptr) return pattern;
    std::string fallback = scratchDirectory() + "/hardware";
    std::filesystem::create_directories(fallback);
    return fallback;
  }();
  return directory;
}

void writeText(const std::filesystem::path& file, const std::string& text) {
  std::filesystem::create_directories(file.parent_path());
  std::ofstream out(file);
  out << text;
  if (!out) throw std::runtime_error("cannot write " + file.string());
}

// An enclosure class of two enclosures of `slots` bays each, as the kernel shows it: the class
// holds links into the device tree; an enclosure holds id, components, uevent, power/ and the
// device and subsystem links beside its components; a bay holds its seven attributes and, when a
// disk is in it, a device link. The first enclosure names its bays "SLOT 01", ..., the second
// numbers them. One bay in five is lit. Returns the class directory.
std::string enclosureClass(int slots) {
  const std::filesystem::path root =
      hardwareDirectory() + "/enclosures-" + std::to_string(slots) + "/sys";
  const std::filesystem::path classDirectory = root / "class/enclosure";
  std::filesystem::create_directories(classDirectory);
  const std::vector<std::pair<std::string, std::string>> enclosures = {
      {"0:0:8:0", "0x500605b0000272bf"}, {"0:0:9:0", "0x500605b0000272c0"}};
  for (std::size_t e = 0; e < enclosures.size(); ++e) {
    const auto& [name, id] = enclosures[e];
    const std::filesystem::path relative = std::filesystem::path("devices/host0") /
                                           ("target" + name.substr(0, name.size() - 2)) / name /
                                           "enclosure" / name;
    const std::filesystem::path enclosure = root / relative;
    writeText(enclosure / "id", id + "\n");
    writeText(enclosure / "components", std::to_string(slots) + "\n");
    writeText(enclosure / "uevent", "");
    writeText(enclosure / "power/control", "auto\n");
    std::filesystem::create_directory_symlink("../../../" + name, enclosure / "device");
    std::filesystem::create_directory_symlink("../../../../../../class/enclosure",
                                              enclosure / "subsystem");
    std::filesystem::create_directory_symlink("../.." / relative, classDirectory / name);
    for (int slot = 0; slot < slots; ++slot) {
      const std::string label = (slot + 1 < 10 ? "SLOT 0" : "SLOT ") + std::to_string(slot + 1);
      const std::filesystem::path bay = enclosure / (e == 0 ? label : std::to_string(slot));
      writeText(bay / "locate", slot % 5 == 0 ? "1\n" : "0\n");
      writeText(bay / "slot", std::to_string(e == 0 ? slot + 1 : slot) + "\n");
      writeText(bay / "fault", "0\n");
      writeText(bay / "active", "0\n");
      writeText(bay / "status", slot % 4 == 3 ? "not installed\n" : "OK\n");
      writeText(bay / "type", "array device\n");
      writeText(bay / "power_status", "on\n");
      if (slot % 4 != 3) {
        std::filesystem::create_directory_symlink(
            "../../../../../target0:0:" + std::to_string(slot) + "/0:0:" + std::to_string(slot) +
                ":0",
            bay / "device");
      }
    }
  }
  return classDirectory.string();
}

// An LED class of eight LEDs, two of them blue lights (a blinking uid and a lit locate).
std::string ledClass() {
  const std::filesystem::path root = hardwareDirectory() + "/leds/sys";
  const std::filesystem::path classDirectory = root / "class/leds";
  std::filesystem::create_directories(classDirectory);
  const std::vector<std::pair<std::string, std::string>> leds = {
      {"input3::capslock", "[none] kbd-capslock"},     {"input3::numlock", "[none] kbd-numlock"},
      {"input3::scrolllock", "[none] kbd-scrolllock"}, {"platform::mute", "[none] audio-mute"},
      {"platform::micmute", "[none] audio-micmute"},   {"mmc0::", "none [mmc0]"},
      {"server:blue:uid", "none [timer] heartbeat"},   {"chassis::locate", "[none] timer"}};
  for (const auto& [name, trigger] : leds) {
    const std::string relative = "devices/platform/leds/leds/" + name;
    writeText(root / relative / "trigger", trigger + "\n");
    writeText(root / relative / "brightness", name == "chassis::locate" ? "255\n" : "0\n");
    writeText(root / relative / "max_brightness", "255\n");
    std::filesystem::create_directory_symlink("../../" + relative, classDirectory / name);
  }
  return classDirectory.string();
}

void removeHardwareTrees() {
  std::error_code ignored;
  std::filesystem::remove_all(hardwareDirectory(), ignored);
}

// Both classes read as a server with enclosures and LEDs is read: each source made afresh and
// walked, one after the other.
Operation hardwareWalk(const std::string& enclosures, const std::string& leds) {
  return [enclosures, leds] {
    Kesta::Instrumentation enclosureCursor(
        std::make_unique<Kesta::platform::EnclosureSource>(enclosures));
    Kesta::Instrumentation ledCursor(std::make_unique<Kesta::platform::SysfsLedSource>(leds));
    return walkLights(enclosureCursor) + walkLights(ledCursor);
  };
}

// The default configuration on a server without a BMC device but with both classes: auto finds
// them under a discovery root (links to the trees above) and reads them in one walk, as the
// provider does at every operation. Its cost over hardwareWalk is what finding the sources takes.
std::string discoveryRoot(const std::string& enclosures, const std::string& leds) {
  const std::filesystem::path root = hardwareDirectory() + "/auto";
  std::filesystem::create_directories(root / "sys/class");
  std::filesystem::create_directories(root / "dev");
  std::filesystem::create_directory_symlink(enclosures, root / "sys/class/enclosure");
  std::filesystem::create_directory_symlink(leds, root / "sys/class/leds");
  return root.string();
}

Operation autoWalk(const std::string& root) {
  return [root] {
    ::setenv("KESTA_INSTRUMENTATION", "auto", 1);
    ::setenv("KESTA_DISCOVERY_ROOT", root.c_str(), 1);
    Kesta::Instrumentation cursor;
    const std::size_t lights = walkLights(cursor);
    ::unsetenv("KESTA_DISCOVERY_ROOT");
    return lights;
  };
}

// ---------------------------------------------------------------------------------------------
// The snapshot parser
// ---------------------------------------------------------------------------------------------

// The text of Walk/`lights`'s tree, as the provider reads it.
std::string treeText(int lights) {
  std::ifstream in(treeFile(lights));
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

// A tree of `count` nodes, three in four of them blue lights, every one with a status and the
// alarm state (the shape of the large trees in the platform's tests).
std::string largeTreeText(int count) {
  std::string text = "{\"nodes\": [\n";
  for (int i = 0; i < count; ++i) {
    text += (i == 0 ? "" : ",\n");
    text += "{\"type\": " + std::string(i % 4 != 3 ? "26" : "7") + ", \"path\": \"1." +
            std::to_string(i) + "\", \"description\": \"Blue Light\", \"status\": " +
            std::to_string(i % 2 == 0 ? 1 : 20) +
            ", \"properties\": {\"1\": " + std::to_string(1 + i % 3) + "}}";
  }
  return text + "\n]}\n";
}

// Parses `text` again and again; N is the number of nodes.
void registerParse(const std::string& name, const std::string& text) {
  const auto parse = [](const std::string& json) {
    return Kesta::platform::parseNodeSnapshot(json);
  };
  const int count = static_cast<int>(parse(text).size());
  benchmark::RegisterBenchmark(
      (name + "/" + std::to_string(count)).c_str(),
      [text, parse, count](benchmark::State& state) {
        bench::HeapCost heap;
        for (int i = 0; i < 3; ++i) {
          const bench::HeapCost one = bench::measureHeap([&] { return parse(text).size(); });
          heap.allocations = one.allocations;
          heap.peakAbove = std::max(heap.peakAbove, one.peakAbove);
        }
        for (auto _ : state) {
          benchmark::DoNotOptimize(parse(text));
        }
        state.counters["lights"] = count;
        state.counters["allocs"] = static_cast<double>(heap.allocations);
        state.counters["peak_B"] = static_cast<double>(heap.peakAbove);
        state.counters["MB_per_s"] = benchmark::Counter(
            static_cast<double>(text.size()) * static_cast<double>(state.iterations()) / 1e6,
            benchmark::Counter::kIsRate);
      })
      ->UseRealTime()
      ->Unit(benchmark::kMicrosecond);
}

void registerParsers(const std::string& prefix) {
  for (const std::string& text : {treeText(4096), largeTreeText(65537)}) {
    registerParse(prefix + "Parse", text);
  }
}

// ---------------------------------------------------------------------------------------------
// Running and recording
// ---------------------------------------------------------------------------------------------

struct Figures {
  double nsPerOp = 0;
  double allocationsPerOp = 0;
  double peakBytesPerOp = 0;
  int lights = 0;
};

std::map<std::string, Figures> figures;  // by benchmark name, e.g. "EnumerateInstances/4096"

// `jsonTree`: the operation reads the JSON tree of `count` lights (KESTA_INSTRUMENTATION).
void registerOperation(const std::string& name, int count, const Operation& operation,
                       std::size_t expected, bool jsonTree = true) {
  benchmark::RegisterBenchmark(
      (name + "/" + std::to_string(count)).c_str(),
      [count, operation, expected, name, jsonTree](benchmark::State& state) {
        if (jsonTree) useTree(count);
        // One operation first: it checks the answer and warms the caches (catalogue, host).
        const std::size_t got = operation();
        if (got != expected) {
          state.SkipWithError(
              (name + " handed over " + std::to_string(got) + ", not " + std::to_string(expected))
                  .c_str());
          return;
        }
        trimLog();
        // The heap of a few operations outside the timed loop: the highest of them counts.
        bench::HeapCost heap;
        for (int i = 0; i < 3; ++i) {
          const bench::HeapCost one = bench::measureHeap(operation);
          heap.allocations = one.allocations;
          heap.peakAbove = std::max(heap.peakAbove, one.peakAbove);
        }
        for (auto _ : state) {
          benchmark::DoNotOptimize(operation());
          trimLog();
        }
        state.counters["lights"] = count;
        state.counters["allocs"] = static_cast<double>(heap.allocations);
        state.counters["peak_B"] = static_cast<double>(heap.peakAbove);
        state.counters["ns_per_light"] =
            benchmark::Counter(static_cast<double>(count) * static_cast<double>(state.iterations()),
                               benchmark::Counter::kIsRate | benchmark::Counter::kInvert);
      })
      ->UseRealTime()
      ->Unit(benchmark::kMicrosecond);
}

// Keeps the figures of each benchmark (the median when repetitions are asked for) while the
// console shows them as usual.
class CollectingReporter : public benchmark::ConsoleReporter {
 public:
  void ReportRuns(const std::vector<Run>& runs) override {
    for (const Run& run : runs) {
      if (run.error_occurred) continue;
      const bool aggregate = run.run_type == Run::RT_Aggregate;
      if (aggregate && run.aggregate_name != "median") continue;
      // The name without the "/real_time" that UseRealTime() appends.
      std::string name = run.run_name.str();
      const std::string suffix = "/real_time";
      if (name.size() > suffix.size() &&
          name.compare(name.size() - suffix.size(), suffix.size(), suffix) == 0) {
        name.erase(name.size() - suffix.size());
      }
      Figures& entry = figures[name];
      if (!aggregate && medians_.count(name) != 0) continue;
      if (aggregate) medians_.insert({name, true});
      // Real time per iteration in nanoseconds, whatever unit the console shows.
      entry.nsPerOp =
          run.GetAdjustedRealTime() / benchmark::GetTimeUnitMultiplier(run.time_unit) * 1e9;
      const auto counter = [&run](const char* key) {
        const auto found = run.counters.find(key);
        return found == run.counters.end() ? 0.0 : found->second.value;
      };
      entry.allocationsPerOp = counter("allocs");
      entry.peakBytesPerOp = counter("peak_B");
      entry.lights = static_cast<int>(counter("lights"));
    }
    ConsoleReporter::ReportRuns(runs);
  }

 private:
  std::map<std::string, bool> medians_;
};

// Heap growth over many operations: after a warm-up, the heap in use must come back to where it
// was, to the byte.
long long heapGrowth(long operations) {
  useTree(kAssociationLights);
  const Operation operation = enumerateInstances();
  for (int i = 0; i < 100; ++i) operation();
  const std::int64_t before = bench::bytesInUse();
  for (long i = 0; i < operations; ++i) operation();
  return static_cast<long long>(bench::bytesInUse() - before);
}

int runChild() {
  ::setenv("KESTA_SYSTEM_NAME", kSystemName.c_str(), 1);
  ::setenv("KESTA_LANGUAGE", "en", 1);
  if (options.sink == "file") {
    ::setenv("VNLOG_SINK", ("file:" + logFile()).c_str(), 1);
    ::setenv("VNLOG_LEVEL", "0", 1);
  } else {
    ::setenv("VNLOG_SINK", "none", 1);
    ::unsetenv("VNLOG_LEVEL");
  }
  provider = std::make_unique<Provider>(options.library);

  const std::string prefix = options.sink + ":";
  for (const int count : kLightCounts) {
    const auto n = static_cast<std::size_t>(count);
    registerOperation(prefix + "EnumerateInstances", count, enumerateInstances(), n);
    registerOperation(prefix + "EnumerateInstanceNames", count, enumerateInstanceNames(), n);
    registerOperation(prefix + "GetInstance", count, getInstance(count), 1);
    registerOperation(prefix + "Floor.Instances", count, floorInstances(count), n);
    registerOperation(prefix + "Floor.Names", count, floorNames(count), n);
    registerOperation(prefix + "Walk", count, walk(), n);
  }
  if (options.sink == "none") {
    registerParsers(prefix);
    const std::string leds = ledClass();
    std::map<int, std::string> enclosures;
    for (const int slots : {kEnclosureSlots, kEnclosureSlotsLarge}) {
      const int lights = 2 * slots + kBlueLeds;
      enclosures[slots] = enclosureClass(slots);
      registerOperation(prefix + "Walk.EnclosureLeds", lights,
                        hardwareWalk(enclosures[slots], leds), static_cast<std::size_t>(lights),
                        false);
    }
    // Both blue LEDs are identify LEDs, so auto finds every light the direct walk reads.
    const int autoLights = 2 * kEnclosureSlots + kBlueLeds;
    registerOperation(prefix + "Walk.Auto", autoLights,
                      autoWalk(discoveryRoot(enclosures[kEnclosureSlots], leds)),
                      static_cast<std::size_t>(autoLights), false);
    const auto n = static_cast<std::size_t>(kAssociationLights);
    const std::string association = "KESTA_BlueLightElementCapabilities";
    const std::string systemDevice = "KESTA_BlueLightSystemDevice";
    registerOperation(prefix + "Associators.ElementCapabilities", kAssociationLights,
                      associators(&Provider::elementCapabilities, capabilitiesPath(), association),
                      n);
    registerOperation(prefix + "References.ElementCapabilities", kAssociationLights,
                      references(&Provider::elementCapabilities, capabilitiesPath(), association),
                      n);
    registerOperation(
        prefix + "Associators.SystemDevice", kAssociationLights,
        associators(&Provider::systemDevice, Provider::computerSystemPath(), systemDevice), n);
    registerOperation(
        prefix + "References.SystemDevice", kAssociationLights,
        references(&Provider::systemDevice, Provider::computerSystemPath(), systemDevice), n);
  }

  std::vector<char*> arguments;
  std::string program = "bluelight-bench";
  arguments.push_back(program.data());
  for (std::string& argument : options.benchmarkArgs) arguments.push_back(argument.data());
  int argumentCount = static_cast<int>(arguments.size());
  benchmark::Initialize(&argumentCount, arguments.data());
  CollectingReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  if (options.sink == "none") removeHardwareTrees();

  long long growth = 0;
  std::size_t liveObjects = 0;
  if (options.sink == "none" && options.growthOps > 0) {
    growth = heapGrowth(options.growthOps);
    liveObjects = provider->broker.liveObjectCount();
  }

  std::ofstream out(options.resultsFile);
  out << std::setprecision(17);
  for (const auto& [name, entry] : figures) {
    out << "R\t" << name << "\t" << entry.nsPerOp << "\t" << entry.allocationsPerOp << "\t"
        << entry.peakBytesPerOp << "\t" << entry.lights << "\n";
  }
  if (options.sink == "none") {
    out << "G\t" << options.growthOps << "\t" << growth << "\t" << liveObjects << "\n";
  }
  provider.reset();
  return out ? 0 : 1;
}

// ---------------------------------------------------------------------------------------------
// The parent: runs the children and reports
// ---------------------------------------------------------------------------------------------

int runChildProcess(const std::string& sink, const std::string& resultsFile, char** argv) {
  std::cout.flush();
  const pid_t child = ::fork();
  if (child < 0) throw std::runtime_error("fork failed");
  if (child == 0) {
    // The child's scratch files go below the parent's, which removes them all at the end.
    ::setenv("TMPDIR", scratchDirectory().c_str(), 1);
    std::vector<std::string> arguments = {
        argv[0], "--bench-child=" + sink, "--bench-results=" + resultsFile,
        "--bench-library=" + options.library,
        "--bench-growth-ops=" + std::to_string(options.growthOps)};
    arguments.insert(arguments.end(), options.benchmarkArgs.begin(), options.benchmarkArgs.end());
    std::vector<char*> pointers;
    pointers.reserve(arguments.size() + 1);
    for (std::string& argument : arguments) pointers.push_back(argument.data());
    pointers.push_back(nullptr);
    ::execv("/proc/self/exe", pointers.data());
    std::perror("execv");
    ::_exit(127);
  }
  int status = 0;
  while (::waitpid(child, &status, 0) < 0) {
  }
  return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

struct Results {
  std::map<std::string, Figures> rows;  // by "<sink>:<name>/<N>"
  long growthOps = -1;
  long long growth = 0;
  long long liveObjects = 0;

  bool has(const std::string& key) const { return rows.count(key) != 0; }
  double ns(const std::string& key) const { return rows.at(key).nsPerOp; }
};

void readResults(const std::string& file, Results& results) {
  std::ifstream in(file);
  std::string line;
  while (std::getline(in, line)) {
    std::istringstream fields(line);
    std::string kind;
    std::getline(fields, kind, '\t');
    if (kind == "R") {
      std::string name;
      Figures entry;
      std::getline(fields, name, '\t');
      fields >> entry.nsPerOp >> entry.allocationsPerOp >> entry.peakBytesPerOp >> entry.lights;
      results.rows[name] = entry;
    } else if (kind == "G") {
      fields >> results.growthOps >> results.growth >> results.liveObjects;
    }
  }
}

std::string fixed(double value, int decimals) {
  std::ostringstream out;
  out << std::fixed << std::setprecision(decimals) << value;
  return out.str();
}

void printTable(const Results& results) {
  std::cout << "\nFigures (median real time; allocations and peak heap of one operation)\n\n";
  std::cout << std::left << std::setw(42) << "operation" << std::right << std::setw(6) << "N"
            << std::setw(14) << "ns/op" << std::setw(10) << "ns/light" << std::setw(10) << "allocs"
            << std::setw(12) << "peak B" << std::setw(9) << "B/light"
            << "\n";
  for (const std::string sink : {"none", "file"}) {
    for (const auto& [key, entry] : results.rows) {
      if (key.compare(0, sink.size() + 1, sink + ":") != 0) continue;
      const std::string name = key.substr(0, key.rfind('/'));
      const double lights = entry.lights > 0 ? entry.lights : 1;
      std::cout << std::left << std::setw(42) << name << std::right << std::setw(6) << entry.lights
                << std::setw(14) << fixed(entry.nsPerOp, 0) << std::setw(10)
                << fixed(entry.nsPerOp / lights, 0) << std::setw(10)
                << fixed(entry.allocationsPerOp, 0) << std::setw(12)
                << fixed(entry.peakBytesPerOp, 0) << std::setw(9)
                << fixed(entry.peakBytesPerOp / lights, 0) << "\n";
    }
  }
}

// One ratio against its target; missing figures count as a failure.
struct Check {
  std::string what;
  double value = NAN;
  double limit = 0;
  std::string unit;
  bool pass() const { return !std::isnan(value) && value <= limit; }
};

std::vector<Check> checks(const Results& r) {
  std::vector<Check> list;
  const auto ratio = [&r](const std::string& top, const std::vector<std::string>& bottom) {
    if (!r.has(top)) return static_cast<double>(NAN);
    double sum = 0;
    for (const std::string& key : bottom) {
      if (!r.has(key)) return static_cast<double>(NAN);
      sum += r.ns(key);
    }
    return r.ns(top) / sum;
  };
  const auto perLight = [&r](const std::string& key) {
    return r.has(key) ? r.ns(key) / r.rows.at(key).lights : static_cast<double>(NAN);
  };
  const auto scaling = [&](const std::string& name) {
    return perLight(name + "/4096") / perLight(name + "/256");
  };
  list.push_back(
      {"R = EnumerateInstances(4096, sink none) / (floor + walk)",
       ratio("none:EnumerateInstances/4096", {"none:Floor.Instances/4096", "none:Walk/4096"}), 1.5,
       ""});
  list.push_back(
      {"EnumerateInstances(4096, every line to a file) / (floor + walk)",
       ratio("file:EnumerateInstances/4096", {"file:Floor.Instances/4096", "file:Walk/4096"}), 3.0,
       ""});
  list.push_back({"ns per light at 4096 / at 256, EnumerateInstances, sink none",
                  scaling("none:EnumerateInstances"), 1.3, ""});
  list.push_back({"ns per light at 4096 / at 256, EnumerateInstances, file",
                  scaling("file:EnumerateInstances"), 1.3, ""});
  // Peak heap O(N): the bytes per light may not grow with N.
  const auto peakPerLight = [&r](const std::string& key) {
    return r.has(key) ? r.rows.at(key).peakBytesPerOp / r.rows.at(key).lights
                      : static_cast<double>(NAN);
  };
  list.push_back(
      {"peak heap per light at 4096 / at 256, EnumerateInstances, sink none",
       peakPerLight("none:EnumerateInstances/4096") / peakPerLight("none:EnumerateInstances/256"),
       1.3, ""});
  // The server's own hardware classes: a shelf pair of 24 bays and the LEDs within 2 ms, and
  // the cost per light the same at 96 bays.
  const std::string smallWalk =
      "none:Walk.EnclosureLeds/" + std::to_string(2 * kEnclosureSlots + kBlueLeds);
  const std::string largeWalk =
      "none:Walk.EnclosureLeds/" + std::to_string(2 * kEnclosureSlotsLarge + kBlueLeds);
  list.push_back({"enclosures (2 x 24 bays) + LED class walk, ms",
                  r.has(smallWalk) ? r.ns(smallWalk) / 1e6 : static_cast<double>(NAN), 2.0, ""});
  list.push_back({"ns per light at 2 x 96 bays / at 2 x 24, enclosures + LED class walk",
                  perLight(largeWalk) / perLight(smallWalk), 1.3, ""});
  // auto over the same classes: finding the sources may add little to reading them.
  const std::string autoWalk = "none:Walk.Auto/" + std::to_string(2 * kEnclosureSlots + kBlueLeds);
  list.push_back({"auto walk / the same classes walked directly (2 x 24 bays + LEDs)",
                  ratio(autoWalk, {smallWalk}), 1.3, ""});
  if (r.growthOps >= 0) {
    list.push_back(
        {"heap growth over " + std::to_string(r.growthOps) + " EnumerateInstances(256), bytes",
         static_cast<double>(r.growth), 0, ""});
    list.push_back({"broker objects alive after them", static_cast<double>(r.liveObjects), 0, ""});
  }
  return list;
}

void printInformativeRatios(const Results& r) {
  std::cout << "\nEach operation against its floor plus walk (for information)\n\n";
  for (const std::string sink : {"none", "file"}) {
    for (const int count : kLightCounts) {
      const std::string n = "/" + std::to_string(count);
      // The keys of the results: "<sink>:<operation>/<count>".
      const auto keyOf = [&sink](const std::string& operation) {
        return std::string(sink).append(":").append(operation);
      };
      const std::string walkKey = keyOf("Walk" + n);
      const std::vector<std::pair<std::string, std::string>> pairs = {
          {"EnumerateInstances" + n, "Floor.Instances" + n},
          {"EnumerateInstanceNames" + n, "Floor.Names" + n},
          {"GetInstance" + n, "Floor.Instances/1"}};
      for (const auto& [operation, floor] : pairs) {
        const std::string key = keyOf(operation);
        const std::string floorKey = keyOf(floor);
        if (!r.has(key) || !r.has(walkKey) || !r.has(floorKey)) continue;
        std::cout << "  " << std::left << std::setw(40) << key << std::right
                  << fixed(r.ns(key) / (r.ns(floorKey) + r.ns(walkKey)), 2) << "\n";
      }
    }
  }
}

int runParent(char** argv) {
  Results results;
  std::stringstream sinks(options.sinks);
  std::string sink;
  while (std::getline(sinks, sink, ',')) {
    if (sink != "none" && sink != "file") {
      std::cerr << "unknown sink \"" << sink << "\" (none or file)\n";
      return 2;
    }
    const std::string resultsFile = scratchDirectory() + "/results-" + sink + ".txt";
    std::cout << "=== log sink: " << (sink == "none" ? "none" : "file, VNLOG_LEVEL=0")
              << " ===" << std::endl;
    const int status = runChildProcess(sink, resultsFile, argv);
    if (status != 0) {
      std::cerr << "the benchmark run with sink " << sink << " failed (" << status << ")\n";
      return 2;
    }
    readResults(resultsFile, results);
  }
  printTable(results);
  printInformativeRatios(results);

  std::cout << "\nTargets\n\n";
  bool allPass = true;
  for (const Check& check : checks(results)) {
    if (std::isnan(check.value)) {
      std::cout << "  n/a   " << check.what << " (not measured)\n";
      continue;
    }
    allPass = allPass && check.pass();
    std::cout << "  " << (check.pass() ? "PASS" : "FAIL") << "  " << std::left << std::setw(72)
              << check.what << std::right << std::setw(10) << fixed(check.value, 2) << "  (at most "
              << fixed(check.limit, 1) << ")\n";
  }
  std::cout << std::endl;
  const char* strict = std::getenv("BENCH_STRICT");
  if (!allPass && strict != nullptr && std::string(strict) == "1") return 1;
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  try {
    options = parseOptions(argc, argv);
    if (!options.sink.empty()) return runChild();
    const int status = runParent(argv);
    std::error_code ignored;
    std::filesystem::remove_all(scratchDirectory(), ignored);
    return status;
  } catch (const std::exception& error) {
    std::cerr << "bluelight-bench: " << error.what() << "\n";
    return 2;
  }
}
