// The "enclosure:" source on trees laid out as the kernel's enclosure class lays them out.
//
// Two kinds of tree, each where it serves best:
//   - fixtures/enclosure/sys is committed: a class directory of symbolic links into a device
//     tree, two enclosures (0:0:9:0 with an id, 0:0:8:0 without), named and numbered components,
//     one without a locate attribute, a garbage locate, device links of which two dangle, and the
//     enclosures' own entries (device, power, subsystem, uevent, components). Being in the
//     repository, the layout can be read and reviewed (ls -lR) like the kernel's, and the same
//     tree serves these tests, the cursor through KESTA_INSTRUMENTATION and the provider test.
//     Failures the tree cannot hold (EACCES as root, EIO, a file that vanishes) are injected with
//     FakeFileSystem::overRealFiles().
//   - small trees built in memory (FakeFileSystem) for the rules one at a time: names, order,
//     values, options. Their root is /t/sys, so nothing here can reach the machine's own /sys.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "FakeFileSystem.h"
#include "KestaInstrumentation.h"
#include "PlatformTestSupport.h"
#include "instrumentation/IdentifyLight.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/enclosure/EnclosureSource.h"

namespace {

using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::enclosureLocateReading;
using Kesta::platform::EnclosureSource;
using Kesta::platform::IdentifyReading;
using Kesta::platform::IdentifyState;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::makeInstrumentationSource;
using Kesta::platform::OnReport;
using Kesta::platform::parseEnclosureSource;
using Kesta::platform::SourceError;
using platform_test::FakeFileSystem;
using testsupport::LogCapture;
using testsupport::ScopedEnv;
using testsupport::TempDir;
using Call = FakeFileSystem::Call;

constexpr auto kBlueLight = NodeLexicon::NODE_TYPE_BLUE_LIGHT;
constexpr auto kAlarmState = NodeLexicon::PROPERTY_ALARM_STATE;

const std::string kFixture = std::string(PLATFORM_TEST_FIXTURES) + "/enclosure/sys/class/enclosure";
const std::string kEnclosure8 = kFixture + "/0:0:8:0";
const std::string kEnclosure9 = kFixture + "/0:0:9:0";
const std::string kLogPrefix = "Kesta.Platform.Instrumentation\t6000\tLOG\t";

// A light as the source gives it: status 1 with the alarm state, or the degraded 21 without.
InstrumentationNode light(const std::string& path, const std::string& description,
                          std::optional<unsigned int> alarmState) {
  InstrumentationNode node;
  node.type = kBlueLight;
  node.path = path;
  node.description = description;
  node.status = alarmState ? 1u : 21u;
  if (alarmState) {
    node.properties.push_back({kAlarmState, *alarmState});
  }
  return node;
}

// The fixture's lights with the alarm state of a light that is on.
std::vector<InstrumentationNode> fixtureLights(unsigned int on) {
  const std::string idless = " locate light, enclosure 0:0:8:0";
  const std::string named = " locate light, enclosure 0x500605b0000272bf";
  return {light("enclosure/0:0:8:0/0", "Slot 0" + idless, 1u),
          light("enclosure/0:0:8:0/1", "Slot 1" + idless, on),
          light("enclosure/0:0:8:0/3", "Slot 3" + idless, 1u),
          light("enclosure/0:0:8:0/10", "Slot 10" + idless, 1u),
          light("enclosure/0x500605b0000272bf/1", "SLOT 01" + named, on),
          light("enclosure/0x500605b0000272bf/2", "SLOT 02" + named, 1u),
          light("enclosure/0x500605b0000272bf/10", "SLOT 10" + named, std::nullopt),
          light("enclosure/0x500605b0000272bf/ArrayDevice05", "ArrayDevice05" + named, 1u)};
}

std::string garbageLine(const std::string& source) {
  return kLogPrefix + "Instrumentation source \"" + source +
         "\" cannot read the locate light of \"SLOT 10 locate light, enclosure "
         "0x500605b0000272bf\": it holds \"2\", not 0 or 1";
}

// `name` in `directory`.
std::string in(const std::string& directory, const std::string& name) {
  return directory + "/" + name;
}

std::vector<std::string> paths(const std::vector<InstrumentationNode>& nodes) {
  std::vector<std::string> result;
  result.reserve(nodes.size());
  for (const InstrumentationNode& node : nodes) {
    result.push_back(node.path);
  }
  return result;
}

// ---------------------------------------------------------------------------------------------
// In-memory trees
// ---------------------------------------------------------------------------------------------

const std::string kMemoryClass = "/t/sys/class/enclosure";

// An enclosure class in memory, built as the kernel builds it: the class entry is a link to the
// enclosure's directory in the device tree, which holds the device's own entries beside the
// components.
class MemoryClass {
 public:
  MemoryClass() { files->addDirectory(kMemoryClass); }

  // Adds enclosure `name`; without `id` it has no id attribute. Returns its directory.
  std::string enclosure(const std::string& name, const std::optional<std::string>& id) {
    std::string directory = "/t/sys/devices/host0/" + name + "/enclosure/" + name;
    files->addDirectory(directory);
    files->addFile(directory + "/components", "0\n");
    files->addFile(directory + "/uevent", "");
    files->addFile(directory + "/power/control", "auto\n");
    files->addSymlink(directory + "/device", "../..");
    files->addSymlink(directory + "/subsystem", "../../../../../class/enclosure");
    if (id) {
      files->addFile(directory + "/id", *id);
    }
    files->addSymlink(kMemoryClass + "/" + name,
                      "../../devices/host0/" + name + "/enclosure/" + name);
    return directory;
  }

  // Adds a component; a missing optional leaves the attribute out.
  void component(const std::string& enclosure, const std::string& name,
                 const std::optional<std::string>& locate,
                 const std::optional<std::string>& slot = std::nullopt) {
    const std::string directory = enclosure + "/" + name;
    files->addFile(directory + "/status", "OK\n");
    files->addFile(directory + "/type", "array device\n");
    files->addFile(directory + "/fault", "0\n");
    if (locate) {
      files->addFile(directory + "/locate", *locate);
      // sysfs reports a page as the size of every attribute, whatever it holds.
      files->changeStatus(directory + "/locate", [](struct stat& info) { info.st_size = 4096; });
    }
    if (slot) {
      files->addFile(directory + "/slot", *slot);
    }
  }

  std::vector<InstrumentationNode> read(OnReport onReport = OnReport::Alternating) const {
    return EnclosureSource(kMemoryClass, files, onReport).readNodes();
  }

  std::shared_ptr<FakeFileSystem> files = std::make_shared<FakeFileSystem>();
};

const std::string kMemorySource = "enclosure:" + kMemoryClass;

// ---------------------------------------------------------------------------------------------
// The committed tree
// ---------------------------------------------------------------------------------------------

TEST(EnclosureSource, GivesOneLightPerLocateAttributeOfTheKernelsLayout) {
  LogCapture capture;
  const std::vector<InstrumentationNode> nodes = EnclosureSource(kFixture).readNodes();
  EXPECT_EQ(nodes, fixtureLights(3u));
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{garbageLine("enclosure:" + kFixture)});
}

TEST(EnclosureSource, ReadsIdOncePerEnclosureSlotAndLocateOncePerLightAndNothingElse) {
  const auto files = FakeFileSystem::overRealFiles();
  EXPECT_EQ(EnclosureSource(kFixture, files).readNodes(), fixtureLights(3u));

  EXPECT_EQ(files->count(Call::Open, kEnclosure8 + "/id"), 1u);  // tried: it has none
  EXPECT_EQ(files->count(Call::Open, kEnclosure9 + "/id"), 1u);
  for (const std::string component :
       {"0:0:8:0/0", "0:0:8:0/1", "0:0:8:0/3", "0:0:8:0/10", "0:0:9:0/SLOT 01", "0:0:9:0/SLOT 02",
        "0:0:9:0/SLOT 10", "0:0:9:0/ArrayDevice05"}) {
    const std::string directory = in(kFixture, component);
    EXPECT_EQ(files->count(Call::Open, in(directory, "locate")), 1u) << component;
    EXPECT_EQ(files->count(Call::Read, in(directory, "locate")), 2u)
        << component << ": the value, then the end of the file";
    EXPECT_EQ(files->count(Call::Open, in(directory, "slot")), 1u) << component;
  }
  // Every open is one of those, and the listings are the class and the two enclosures.
  std::size_t opens = 0;
  std::size_t listings = 0;
  for (const std::string& call : files->calls()) {
    opens += call.rfind("open ", 0) == 0 ? 1 : 0;
    listings += call.rfind("list ", 0) == 0 ? 1 : 0;
    // Nothing else of a component or of the enclosure device is touched: not the status, not
    // the device link (two of which dangle), not the power directory.
    for (const std::string untouched : {"/status", "/type", "/fault", "/active", "/power",
                                        "/device", "/subsystem", "/uevent", "/components"}) {
      EXPECT_EQ(call.find(untouched), std::string::npos) << call;
    }
    if (call.find("0:0:8:0/2/") != std::string::npos) {
      EXPECT_EQ(call, "stat " + kEnclosure8 + "/2/locate") << "component 2 has no locate light";
    }
  }
  EXPECT_EQ(opens, 2u + 8u + 8u);
  EXPECT_EQ(listings, 3u);
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(EnclosureSource, AnUnreadableLocateDegradesThatLightAloneWithOneLogLineEach) {
  const auto files = FakeFileSystem::overRealFiles();
  // As root the kernel would let a file of mode 0 be read, so the refusal is injected.
  files->fail(Call::Open, kEnclosure9 + "/SLOT 02/locate", EACCES);
  files->fail(Call::Read, kEnclosure8 + "/0/locate", EIO);
  // Listed, then gone before it was read (the bay's expander went away).
  files->fail(Call::Open, kEnclosure8 + "/10/locate", ENOENT);
  LogCapture capture;
  const std::vector<InstrumentationNode> nodes = EnclosureSource(kFixture, files).readNodes();

  std::vector<InstrumentationNode> expected = fixtureLights(3u);
  for (const std::size_t degraded : {0u, 3u, 5u}) {
    expected[degraded].status = 21;
    expected[degraded].properties.clear();
  }
  EXPECT_EQ(nodes, expected);
  const std::string source = "Instrumentation source \"enclosure:" + kFixture + "\" ";
  EXPECT_EQ(platform_test::rawLines(capture),
            (std::vector<std::string>{
                kLogPrefix + source +
                    "cannot read the locate light of \"Slot 0 locate light, enclosure 0:0:8:0\": "
                    "Input/output error",
                kLogPrefix + source +
                    "cannot read the locate light of \"Slot 10 locate light, enclosure "
                    "0:0:8:0\": No such file or directory",
                kLogPrefix + source +
                    "cannot read the locate light of \"SLOT 02 locate light, enclosure "
                    "0x500605b0000272bf\": Permission denied",
                garbageLine("enclosure:" + kFixture)}));
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(EnclosureSource, AnEnclosureThatCannotBeListedLosesOnlyItsOwnLights) {
  const std::vector<InstrumentationNode> all = fixtureLights(3u);
  const std::vector<InstrumentationNode> ofEnclosure9(all.begin() + 4, all.end());
  const std::string cannotList = kLogPrefix + "Instrumentation source \"enclosure:" + kFixture +
                                 "\" cannot list enclosure \"0:0:8:0\": ";
  for (const Call call : {Call::OpenDirectory, Call::List}) {
    const auto files = FakeFileSystem::overRealFiles();
    files->fail(call, kEnclosure8, call == Call::List ? EIO : EACCES);
    LogCapture capture;
    EXPECT_EQ(EnclosureSource(kFixture, files).readNodes(), ofEnclosure9);
    EXPECT_EQ(platform_test::rawLines(capture),
              (std::vector<std::string>{
                  cannotList + (call == Call::List ? "Input/output error" : "Permission denied"),
                  garbageLine("enclosure:" + kFixture)}));
    EXPECT_EQ(files->count(Call::Open, kEnclosure8 + "/id"), 0u);
    EXPECT_EQ(files->openDescriptors(), 0u);
  }
}

TEST(EnclosureSource, AnEnclosureThatGoesAfterTheListingIsLeftOutSilently) {
  const auto files = FakeFileSystem::overRealFiles();
  files->fail(Call::OpenDirectory, kEnclosure9, ENOENT);
  LogCapture capture;
  const std::vector<InstrumentationNode> all = fixtureLights(3u);
  EXPECT_EQ(EnclosureSource(kFixture, files).readNodes(),
            std::vector<InstrumentationNode>(all.begin(), all.begin() + 4));
  EXPECT_TRUE(platform_test::rawLines(capture).empty());
}

TEST(EnclosureSource, ThroughTheCursor) {
  LogCapture capture;
  Instrumentation cursor(std::make_unique<EnclosureSource>(kFixture));
  ASSERT_TRUE(cursor.selectNode(kBlueLight));
  std::vector<InstrumentationNode> seen;
  for (; cursor; ++cursor) {
    InstrumentationNode node;
    node.type = kBlueLight;
    node.path = cursor.convertPathToString(cursor.getPathToNode());
    node.description = cursor.getNodeDescription();
    node.status = cursor.getNodeStatus();
    unsigned int state = 0;
    if (cursor.getProperty(kAlarmState, state)) {
      node.properties.push_back({kAlarmState, state});
    }
    seen.push_back(node);
  }
  EXPECT_EQ(seen, fixtureLights(3u));
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{garbageLine("enclosure:" + kFixture)});
}

TEST(EnclosureSource, ThroughKestaInstrumentationWithOnSteady) {
  ScopedEnv source("KESTA_INSTRUMENTATION", "enclosure:" + kFixture + "?on=steady");
  LogCapture capture;
  Instrumentation cursor;
  ASSERT_TRUE(cursor.selectNode(kBlueLight));
  std::vector<std::string> seenPaths;
  std::vector<unsigned int> states;
  for (; cursor; ++cursor) {
    seenPaths.push_back(cursor.getPathToNode());
    unsigned int state = 0;
    states.push_back(cursor.getProperty(kAlarmState, state) ? state : 0u);
  }
  EXPECT_EQ(seenPaths, paths(fixtureLights(2u)));
  EXPECT_EQ(states, (std::vector<unsigned int>{1, 2, 1, 1, 2, 1, 0, 1}));
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{garbageLine("enclosure:" + kFixture + "?on=steady")});
}

TEST(EnclosureSource, AMissingClassDirectoryIsLoggedAndThrownByTheCursor) {
  TempDir tree;
  const std::string missing = tree.file("enclosure");
  ScopedEnv source("KESTA_INSTRUMENTATION", "enclosure:" + missing);
  LogCapture capture;
  std::string what;
  try {
    Instrumentation cursor;
  } catch (const std::exception& error) {
    what = error.what();
  }
  EXPECT_EQ(what, "Instrumentation source \"enclosure:" + missing +
                      "\" (from KESTA_INSTRUMENTATION) cannot be read: No such file or directory");
  EXPECT_EQ(platform_test::rawLines(capture), std::vector<std::string>{kLogPrefix + what});
}

TEST(EnclosureSource, AClassDirectoryThatCannotBeOpenedOrListedIsThrown) {
  const MemoryClass tree;
  tree.files->fail(Call::OpenDirectory, kMemoryClass, EACCES, 1);
  tree.files->fail(Call::List, kMemoryClass, EIO, 1);
  tree.files->fail(Call::OpenDirectory, kMemoryClass, ENOTDIR, 1);
  // The failures are met in the order the calls come: open, open, then open and list.
  for (const std::string expected :
       {"Permission denied", "Not a directory", "Input/output error"}) {
    try {
      tree.read();
      ADD_FAILURE() << "no exception for " << expected;
    } catch (const SourceError& error) {
      EXPECT_EQ(std::string(error.what()), expected);
    }
  }
  EXPECT_TRUE(tree.read().empty());
  EXPECT_EQ(tree.files->openDescriptors(), 0u);
}

TEST(EnclosureSource, NoEnclosuresNoLights) {
  TempDir empty;
  LogCapture capture;
  EXPECT_TRUE(EnclosureSource(empty.path()).readNodes().empty());
  const MemoryClass tree;
  EXPECT_TRUE(tree.read().empty());
  EXPECT_TRUE(platform_test::rawLines(capture).empty());
}

// ---------------------------------------------------------------------------------------------
// Names
// ---------------------------------------------------------------------------------------------

TEST(EnclosureSource, TheSlotLabelAndKeyComeFromTheNameAndTheSlotAttribute) {
  MemoryClass tree;
  const std::string enclosure = tree.enclosure("0:0:8:0", "0x500605b0000272bf\n");
  tree.component(enclosure, "6", "0\n", "7\n");                 // numbered, slot 7
  tree.component(enclosure, "3", "0\n");                        // numbered, no slot attribute
  tree.component(enclosure, "4", "0\n", "-1\n");                // numbered, slot not a number
  tree.component(enclosure, "SLOT 01", "0\n", " 1 \n");         // named, slot 1
  tree.component(enclosure, "Disk 001", "0\n");                 // named, no slot attribute
  tree.component(enclosure, "ArrayDevice05", "0\n", "many\n");  // named, slot not a number
  const std::string id = " locate light, enclosure 0x500605b0000272bf";
  const std::string path = "enclosure/0x500605b0000272bf/";
  EXPECT_EQ(tree.read(),
            (std::vector<InstrumentationNode>{
                light(path + "1", "SLOT 01" + id, 1u), light(path + "3", "Slot 3" + id, 1u),
                light(path + "4", "Slot 4" + id, 1u), light(path + "7", "Slot 7" + id, 1u),
                light(path + "ArrayDevice05", "ArrayDevice05" + id, 1u),
                light(path + "Disk 001", "Disk 001" + id, 1u)}));
}

TEST(EnclosureSource, AnEnclosureWithoutAUsableIdIsNamedByItsDirectory) {
  MemoryClass tree;
  tree.component(tree.enclosure("0:0:1:0", std::nullopt), "3", "1\n");    // no id attribute
  tree.component(tree.enclosure("0:0:2:0", " \n"), "3", "1\n");           // blank
  tree.component(tree.enclosure("0:0:3:0", "0x5000\x01\n"), "3", "1\n");  // control character
  tree.component(tree.enclosure("0:0:4:0", "0x5000c50000a1b2c3\n"), "3", "1\n");  // unreadable
  tree.component(tree.enclosure("0:0:5:0", "\t0x5000c50000d4e5f6 \n"), "3", "1\n");
  tree.files->fail(Call::Read, "/t/sys/class/enclosure/0:0:4:0/id", EIO);
  LogCapture capture;
  EXPECT_EQ(tree.read(),
            (std::vector<InstrumentationNode>{
                light("enclosure/0:0:1:0/3", "Slot 3 locate light, enclosure 0:0:1:0", 3u),
                light("enclosure/0:0:2:0/3", "Slot 3 locate light, enclosure 0:0:2:0", 3u),
                light("enclosure/0:0:3:0/3", "Slot 3 locate light, enclosure 0:0:3:0", 3u),
                light("enclosure/0:0:4:0/3", "Slot 3 locate light, enclosure 0:0:4:0", 3u),
                light("enclosure/0x5000c50000d4e5f6/3",
                      "Slot 3 locate light, enclosure 0x5000c50000d4e5f6", 3u)}));
  EXPECT_TRUE(platform_test::rawLines(capture).empty());
}

TEST(EnclosureSource, TheDeviceIdDoesNotDependOnTheEnclosuresDeviceName) {
  // The same shelf after a reboot that numbered the SCSI devices differently.
  MemoryClass before;
  before.component(before.enclosure("0:0:8:0", "0x500605b0000272bf\n"), "SLOT 01", "0\n", "1\n");
  MemoryClass after;
  after.component(after.enclosure("2:0:31:0", "0x500605b0000272bf\n"), "SLOT 01", "0\n", "1\n");
  EXPECT_EQ(before.read(), after.read());
}

TEST(EnclosureSource, NamesWithControlCharactersOrNotUtf8AreSkippedWithALogLine) {
  MemoryClass tree;
  const std::string good = tree.enclosure("0:0:8:0", "0x500605b0000272bf\n");
  tree.component(good,
                 "SLOT\x01"
                 "01",
                 "1\n", "1\n");
  tree.component(good, "SLOT \xff", "1\n", "2\n");
  tree.component(good, "SLOT\n03", std::nullopt, "3\n");  // no locate light: nothing to say
  tree.component(good, "SLOT 04", "1\n", "4\n");
  tree.component(tree.enclosure("0:0:9:0\t", std::nullopt), "1", "1\n");
  LogCapture capture;
  EXPECT_EQ(tree.read(), (std::vector<InstrumentationNode>{
                             light("enclosure/0x500605b0000272bf/4",
                                   "SLOT 04 locate light, enclosure 0x500605b0000272bf", 3u)}));
  const std::string source = kLogPrefix + "Instrumentation source \"" + kMemorySource + "\" ";
  EXPECT_EQ(platform_test::rawLines(capture),
            (std::vector<std::string>{
                source + "skips component \"SLOT\\x0101\" of enclosure \"0x500605b0000272bf\": "
                         "its name holds control characters",
                source + "skips component \"SLOT \\xFF\" of enclosure \"0x500605b0000272bf\": "
                         "its name is not UTF-8 text",
                source + "skips enclosure \"0:0:9:0\\x09\": its name holds control characters"}));
  // A skipped component's attributes are not read, its locate least of all.
  for (const std::string& call : tree.files->calls()) {
    EXPECT_TRUE(call.find("SLOT\x01") == std::string::npos || call.rfind("stat ", 0) == 0) << call;
  }
}

// ---------------------------------------------------------------------------------------------
// Order
// ---------------------------------------------------------------------------------------------

TEST(EnclosureSource, EnclosuresByDirectoryNameComponentsByNumericSlotKeyThenByName) {
  MemoryClass tree;
  const std::string first = tree.enclosure("0:0:10:0", std::nullopt);
  const std::string second = tree.enclosure("0:0:9:0", std::nullopt);
  for (const std::string name : {"10", "9", "100", "2", "0"}) {
    tree.component(second, name, "0\n");
  }
  tree.component(first, "Fan", "0\n");  // no slot: keyed by name
  tree.component(first, "ArrayDevice", "0\n");
  tree.component(first, "SLOT 10", "0\n", "10\n");
  tree.component(first, "SLOT 9", "0\n", "9\n");
  tree.component(first, "SLOT 9b", "0\n", "9\n");  // the same slot: by name
  tree.component(first, "Disk", "0\n", "0009\n");  // the value counts, not the digits
  tree.component(first, "Big", "0\n", "123456789012345678901234567890\n");
  EXPECT_EQ(paths(tree.read()),
            (std::vector<std::string>{
                "enclosure/0:0:10:0/0009", "enclosure/0:0:10:0/9", "enclosure/0:0:10:0/9",
                "enclosure/0:0:10:0/10", "enclosure/0:0:10:0/123456789012345678901234567890",
                "enclosure/0:0:10:0/ArrayDevice", "enclosure/0:0:10:0/Fan", "enclosure/0:0:9:0/0",
                "enclosure/0:0:9:0/2", "enclosure/0:0:9:0/9", "enclosure/0:0:9:0/10",
                "enclosure/0:0:9:0/100"}));
  const std::vector<InstrumentationNode> nodes = tree.read();
  EXPECT_EQ(nodes[1].description, "SLOT 9 locate light, enclosure 0:0:10:0");
  EXPECT_EQ(nodes[2].description, "SLOT 9b locate light, enclosure 0:0:10:0");
}

// ---------------------------------------------------------------------------------------------
// What is and is not a component
// ---------------------------------------------------------------------------------------------

TEST(EnclosureSource, TheEnclosuresOwnEntriesAreNeverComponents) {
  MemoryClass tree;
  const std::string enclosure = tree.enclosure("0:0:8:0", std::nullopt);
  // Were they taken for components, each of these would be a light.
  for (const std::string own : {"power", "components", "id", "uevent"}) {
    const std::string directory = in(enclosure, own);
    tree.files->remove(directory);
    tree.files->addFile(in(directory, "locate"), "1\n");
  }
  tree.files->addFile("/t/sys/devices/host0/0:0:8:0/locate", "1\n");  // behind `device`
  tree.component(enclosure, "1", "0\n");
  EXPECT_EQ(paths(tree.read()), std::vector<std::string>{"enclosure/0:0:8:0/1"});
}

TEST(EnclosureSource, ComponentsWithoutLocateFilesAndDanglingLinksAreLeftOutSilently) {
  MemoryClass tree;
  const std::string enclosure = tree.enclosure("0:0:8:0", std::nullopt);
  tree.component(enclosure, "0", std::nullopt, "0\n");  // e.g. a fan that has no locate light
  tree.component(enclosure, "1", "1\n", "1\n");
  tree.files->addFile(enclosure + "/stray", "1\n");         // a file, not a component
  tree.files->addSymlink(enclosure + "/2", "../gone");      // a link to nothing
  tree.files->addFile("/t/sys/class/enclosure/notes", "");  // a file in the class directory
  tree.files->addSymlink("/t/sys/class/enclosure/0:0:9:0", "../../devices/gone");
  LogCapture capture;
  EXPECT_EQ(paths(tree.read()), std::vector<std::string>{"enclosure/0:0:8:0/1"});
  EXPECT_TRUE(platform_test::rawLines(capture).empty());
}

TEST(EnclosureSource, ADanglingOrFailingDeviceLinkOfAComponentDoesNotMatter) {
  MemoryClass tree;
  const std::string enclosure = tree.enclosure("0:0:8:0", "0x500605b0000272bf\n");
  tree.component(enclosure, "SLOT 01", "1\n", "1\n");
  tree.files->addSymlink(enclosure + "/SLOT 01/device", "../../../../../target0:0:4/0:0:4:0");
  for (const Call call : {Call::Open, Call::OpenDirectory, Call::StatAt, Call::ReadLink}) {
    tree.files->fail(call, "/t/sys/class/enclosure/0:0:8:0/SLOT 01/device", EIO);
  }
  EXPECT_EQ(tree.read(), (std::vector<InstrumentationNode>{
                             light("enclosure/0x500605b0000272bf/1",
                                   "SLOT 01 locate light, enclosure 0x500605b0000272bf", 3u)}));
}

TEST(EnclosureSource, ALocateThatCannotBeExaminedIsStillReadOnce) {
  MemoryClass tree;
  const std::string enclosure = tree.enclosure("0:0:8:0", std::nullopt);
  tree.component(enclosure, "1", "1\n");
  tree.files->fail(Call::StatAt, "/t/sys/class/enclosure/0:0:8:0/1/locate", EIO);
  EXPECT_EQ(tree.read(),
            (std::vector<InstrumentationNode>{
                light("enclosure/0:0:8:0/1", "Slot 1 locate light, enclosure 0:0:8:0", 3u)}));
  EXPECT_EQ(tree.files->count(Call::Open, "/t/sys/class/enclosure/0:0:8:0/1/locate"), 1u);
}

TEST(EnclosureSource, AnUnreadableSlotFallsBackToTheComponentsName) {
  MemoryClass tree;
  const std::string enclosure = tree.enclosure("0:0:8:0", std::nullopt);
  tree.component(enclosure, "SLOT 01", "0\n", "1\n");
  tree.files->fail(Call::Open, "/t/sys/class/enclosure/0:0:8:0/SLOT 01/slot", EIO);
  EXPECT_EQ(paths(tree.read()), std::vector<std::string>{"enclosure/0:0:8:0/SLOT 01"});
}

// ---------------------------------------------------------------------------------------------
// The locate attribute's values
// ---------------------------------------------------------------------------------------------

struct LocateCase {
  std::string content;
  std::optional<unsigned int> alarmState;  // with on=alternating; none: degraded
  std::string problem;                     // the reason in the log line
};

class EnclosureLocateValues : public ::testing::TestWithParam<LocateCase> {};

TEST_P(EnclosureLocateValues, GiveTheAlarmStateOrTheDegradedRow) {
  const LocateCase& c = GetParam();
  MemoryClass tree;
  tree.component(tree.enclosure("0:0:8:0", "0x500605b0000272bf\n"), "SLOT 01", c.content, "1\n");
  LogCapture capture;
  const std::string description = "SLOT 01 locate light, enclosure 0x500605b0000272bf";
  EXPECT_EQ(tree.read(), std::vector<InstrumentationNode>{
                             light("enclosure/0x500605b0000272bf/1", description, c.alarmState)});
  std::vector<std::string> expectedLines;
  if (!c.alarmState) {
    expectedLines.push_back(kLogPrefix + "Instrumentation source \"" + kMemorySource +
                            "\" cannot read the locate light of \"" + description +
                            "\": " + c.problem);
  }
  EXPECT_EQ(platform_test::rawLines(capture), expectedLines);
}

INSTANTIATE_TEST_SUITE_P(
    Table, EnclosureLocateValues,
    ::testing::Values(LocateCase{"0\n", 1u, ""}, LocateCase{"1\n", 3u, ""}, LocateCase{"0", 1u, ""},
                      LocateCase{" 1 \r\n", 3u, ""}, LocateCase{"\t0\n\n", 1u, ""},
                      LocateCase{"2\n", std::nullopt, "it holds \"2\", not 0 or 1"},
                      LocateCase{"", std::nullopt, "it holds \"\", not 0 or 1"},
                      LocateCase{" \n", std::nullopt, "it holds \"\", not 0 or 1"},
                      LocateCase{"yes\n", std::nullopt, "it holds \"yes\", not 0 or 1"},
                      LocateCase{"01\n", std::nullopt, "it holds \"01\", not 0 or 1"},
                      LocateCase{"1 0\n", std::nullopt, "it holds \"1 0\", not 0 or 1"},
                      LocateCase{"-1\n", std::nullopt, "it holds \"-1\", not 0 or 1"},
                      LocateCase{std::string("\x01\xff\0"
                                             "1",
                                             4),
                                 std::nullopt, "it holds \"\\x01\\xFF\\x001\", not 0 or 1"},
                      LocateCase{std::string(100, 'x'), std::nullopt,
                                 "it holds \"" + std::string(64, 'x') + "\"..., not 0 or 1"},
                      LocateCase{std::string(5000, '1'), std::nullopt,
                                 "it is larger than 4096 bytes"}));

TEST(EnclosureSource, ALocateThatIsADirectoryOrAFifoIsDegraded) {
  MemoryClass tree;
  const std::string enclosure = tree.enclosure("0:0:8:0", std::nullopt);
  tree.files->addDirectory(enclosure + "/1/locate");
  tree.files->addFifo(enclosure + "/2/locate");
  LogCapture capture;
  const std::vector<InstrumentationNode> nodes = tree.read();
  ASSERT_EQ(nodes.size(), 2u);
  EXPECT_EQ(nodes[0].status, 21u);
  EXPECT_EQ(nodes[1].status, 21u);
  const std::vector<std::string> lines = platform_test::rawLines(capture);
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_NE(lines[0].find("enclosure 0:0:8:0\": it is a directory"), std::string::npos);
  EXPECT_NE(lines[1].find("enclosure 0:0:8:0\": it is not a regular file"), std::string::npos);
}

TEST(EnclosureSource, LocateReadingRules) {
  EXPECT_EQ(enclosureLocateReading("0\n").kind, IdentifyReading::Kind::Known);
  EXPECT_EQ(enclosureLocateReading("0\n").state, IdentifyState::Off);
  EXPECT_EQ(enclosureLocateReading(" 1\n").state, IdentifyState::IndefinitelyOn);
  EXPECT_EQ(enclosureLocateReading("2").kind, IdentifyReading::Kind::Unusable);
  EXPECT_EQ(enclosureLocateReading("2").problem, "it holds \"2\", not 0 or 1");
}

// ---------------------------------------------------------------------------------------------
// Options and the source text
// ---------------------------------------------------------------------------------------------

TEST(EnclosureSource, OnSteadyReportsALitLightAsSteady) {
  MemoryClass tree;
  const std::string enclosure = tree.enclosure("0:0:8:0", std::nullopt);
  tree.component(enclosure, "0", "0\n");
  tree.component(enclosure, "1", "1\n");
  const std::vector<InstrumentationNode> nodes = tree.read(OnReport::Steady);
  ASSERT_EQ(nodes.size(), 2u);
  EXPECT_EQ(nodes[0].property(kAlarmState), 1u);
  EXPECT_EQ(nodes[1].property(kAlarmState), 2u);
}

TEST(EnclosureSource, ParsesItsSourceText) {
  EXPECT_EQ(parseEnclosureSource("").directory, "/sys/class/enclosure");
  EXPECT_EQ(parseEnclosureSource("").onReport, OnReport::Alternating);
  EXPECT_EQ(parseEnclosureSource("/x/enclosure").directory, "/x/enclosure");
  EXPECT_EQ(parseEnclosureSource("?on=steady").directory, "/sys/class/enclosure");
  EXPECT_EQ(parseEnclosureSource("?on=steady").onReport, OnReport::Steady);
  EXPECT_EQ(parseEnclosureSource("/x?on=Alternating").onReport, OnReport::Alternating);
  EXPECT_EQ(parseEnclosureSource("/x?on=STEADY").onReport, OnReport::Steady);
}

TEST(EnclosureSource, RefusesUnknownOrBadOptions) {
  const std::vector<std::pair<std::string, std::string>> cases = {
      {"?colour=blue", "unknown option \"colour\" (expected on)"},
      {"/x?on=steady&timeout=1", "unknown option \"timeout\" (expected on)"},
      {"?on=blink", "on=blink must be on=alternating or on=steady"},
      {"?on=steady&on=steady", "the option \"on\" is given twice"},
      {"?", "the options after '?' must be name=value pairs joined by '&'"},
      {"/x?on", "the options after '?' must be name=value pairs joined by '&'"}};
  for (const auto& [text, reason] : cases) {
    try {
      parseEnclosureSource(text);
      ADD_FAILURE() << "no exception for " << text;
    } catch (const SourceError& error) {
      EXPECT_EQ(std::string(error.what()), reason) << text;
    }
  }
}

TEST(EnclosureSource, NameOfTheSource) {
  EXPECT_EQ(EnclosureSource("/sys/class/enclosure").name(), "enclosure:/sys/class/enclosure");
  EXPECT_EQ(makeInstrumentationSource("enclosure:")->name(), "enclosure:/sys/class/enclosure");
  EXPECT_EQ(makeInstrumentationSource("enclosure:/x/enc")->name(), "enclosure:/x/enc");
  EXPECT_EQ(makeInstrumentationSource("enclosure:/x/enc?on=steady")->name(),
            "enclosure:/x/enc?on=steady");
  EXPECT_EQ(makeInstrumentationSource("enclosure:?on=alternating")->name(),
            "enclosure:/sys/class/enclosure");
}

TEST(EnclosureSource, TheFactoryPassesOnTheRefusals) {
  try {
    makeInstrumentationSource("enclosure:/x?speed=1");
    ADD_FAILURE() << "no exception";
  } catch (const SourceError& error) {
    EXPECT_EQ(std::string(error.what()), "unknown option \"speed\" (expected on)");
  }
  EXPECT_THROW(makeInstrumentationSource("enclosure"), SourceError);
  EXPECT_THROW(makeInstrumentationSource("Enclosure:"), SourceError);
}

TEST(EnclosureSource, AnUnknownSchemeNamesTheEnclosureSourceAmongTheExpected) {
  try {
    makeInstrumentationSource("enclosures:");
    ADD_FAILURE() << "no exception";
  } catch (const SourceError& error) {
    EXPECT_NE(std::string(error.what()).find(", enclosure:[<directory>], "), std::string::npos)
        << error.what();
  }
}

}  // namespace
