// The "sysfs:" source on fake LED class trees built in temporary folders.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cerrno>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "FakeFileSystem.h"
#include "KestaInstrumentation.h"
#include "PlatformTestSupport.h"
#include "instrumentation/leds/SysfsLedSource.h"

namespace {

using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::isBlueLight;
using Kesta::platform::isIdentifyLed;
using Kesta::platform::ledAlarmState;
using Kesta::platform::makeSysfsLedSource;
using Kesta::platform::SourceError;
using Kesta::platform::splitLedName;
using Kesta::platform::SysfsLedSource;
using Kesta::platform::systemFileSystem;
using platform_test::FakeFileSystem;
using platform_test::writeFileIn;
using testsupport::LogCapture;
using testsupport::ScopedEnv;
using testsupport::TempDir;

constexpr auto kBlueLight = NodeLexicon::NODE_TYPE_BLUE_LIGHT;
constexpr auto kAlarmState = NodeLexicon::PROPERTY_ALARM_STATE;
using Call = FakeFileSystem::Call;

// One LED folder; a missing optional leaves the file out.
void addLed(const TempDir& tree, const std::string& name, std::optional<std::string> trigger,
            std::optional<std::string> brightness) {
  std::filesystem::create_directories(tree.file(name));
  if (trigger) {
    writeFileIn(tree.file(name + "/trigger"), *trigger + "\n");
  }
  if (brightness) {
    writeFileIn(tree.file(name + "/brightness"), *brightness + "\n");
  }
  writeFileIn(tree.file(name + "/max_brightness"), "255\n");
}

const std::string kAllTriggers = "none kbd-scrolllock disk-activity netdev timer heartbeat";

std::string triggerFile(const std::string& active) {
  return "none timer heartbeat pattern activity default-on [" + active + "] oneshot transient";
}

struct LedCase {
  std::string trigger;  // "" for no trigger file
  std::optional<std::string> brightness;
  std::optional<unsigned int> alarmState;
};

class SysfsTriggers : public ::testing::TestWithParam<LedCase> {};

TEST_P(SysfsTriggers, GiveTheAlarmState) {
  TempDir tree;
  const LedCase& c = GetParam();
  addLed(tree, "platform:blue:status",
         c.trigger.empty() ? std::nullopt : std::optional<std::string>(triggerFile(c.trigger)),
         c.brightness);
  const std::vector<InstrumentationNode> nodes = SysfsLedSource(tree.path()).readNodes();
  ASSERT_EQ(nodes.size(), 1u);
  EXPECT_EQ(nodes[0].property(kAlarmState), c.alarmState);
  EXPECT_EQ(nodes[0].status, c.alarmState ? 1u : 0u);
}

INSTANTIATE_TEST_SUITE_P(
    Table, SysfsTriggers,
    ::testing::Values(LedCase{"none", "0", 1u}, LedCase{"none", "1", 2u},
                      LedCase{"none", "255", 2u}, LedCase{"", "0", 1u}, LedCase{"", "7", 2u},
                      LedCase{"timer", "0", 3u}, LedCase{"timer", "255", 3u},
                      LedCase{"heartbeat", "0", 3u}, LedCase{"pattern", "1", 3u},
                      LedCase{"activity", "0", 3u}, LedCase{"default-on", "255", 2u},
                      LedCase{"default-on", "0", 2u}, LedCase{"oneshot", "0", 1u},
                      LedCase{"transient", "1", 2u}, LedCase{"disk-activity", "0", 1u},
                      LedCase{"netdev", "5", 2u}, LedCase{"phy0tx", "0", 1u},
                      LedCase{"timer", std::nullopt, 3u}, LedCase{"none", std::nullopt, {}},
                      LedCase{"", std::nullopt, {}}, LedCase{"none", "abc", {}},
                      LedCase{"none", "-1", {}}, LedCase{"netdev", "", {}}));

TEST(SysfsSource, PicksBlueAndIdentificationLedsSortedByName) {
  TempDir tree;
  addLed(tree, "acpi0::power", "[none]", "1");
  addLed(tree, "input3::capslock", "[none] kbd-capslock", "0");
  addLed(tree, "platform::mute", "[none]", "0");
  addLed(tree, "green:lan", "[netdev]", "1");
  addLed(tree, "mmc0::", "[mmc0]", "0");
  addLed(tree, "acpi0:red:indicator-id", "[none]", "1");
  addLed(tree, "platform:blue:status", "[none] timer", "0");
  addLed(tree, "chassis::locate", "[default-on]", "255");
  addLed(tree, "bmc:amber:Identify-1", "none [timer]", "0");
  addLed(tree, "uid", std::nullopt, "1");
  addLed(tree, "0000:03:00.0:BLUE:activity", kAllTriggers, "0");
  addLed(tree, "enclosure:white:chassis_locator", "[none]", "0");
  writeFileIn(tree.file("blue:not-a-folder"), "");

  const std::vector<InstrumentationNode> nodes = SysfsLedSource(tree.path()).readNodes();
  std::vector<std::string> paths;
  for (const InstrumentationNode& node : nodes) {
    paths.push_back(node.path);
    EXPECT_EQ(node.type, 26u);
    EXPECT_EQ(node.description, "Blue Light");
    EXPECT_EQ(node.status, 1u);
  }
  EXPECT_EQ(paths, (std::vector<std::string>{"0000:03:00.0:BLUE:activity", "bmc:amber:Identify-1",
                                             "chassis::locate", "enclosure:white:chassis_locator",
                                             "platform:blue:status", "uid"}));
  EXPECT_EQ(nodes[0].property(kAlarmState), 1u);
  EXPECT_EQ(nodes[1].property(kAlarmState), 3u);
  EXPECT_EQ(nodes[2].property(kAlarmState), 2u);
  EXPECT_EQ(nodes[3].property(kAlarmState), 1u);
  EXPECT_EQ(nodes[4].property(kAlarmState), 1u);
  EXPECT_EQ(nodes[5].property(kAlarmState), 2u);
}

TEST(SysfsSource, FollowsTheClassFoldersSymbolicLinks) {
  TempDir root;
  std::filesystem::create_directories(root.file("class"));
  std::filesystem::create_directories(root.file("devices/platform/leds/server:blue:uid"));
  writeFileIn(root.file("devices/platform/leds/server:blue:uid/trigger"), "[heartbeat]\n");
  std::filesystem::create_symlink("../devices/platform/leds/server:blue:uid",
                                  root.file("class/server:blue:uid"));
  std::filesystem::create_symlink("../devices/nowhere", root.file("class/dangling:blue:uid"));
  const auto nodes = SysfsLedSource(root.file("class")).readNodes();
  ASSERT_EQ(nodes.size(), 1u);
  EXPECT_EQ(nodes[0].path, "server:blue:uid");
  EXPECT_EQ(nodes[0].property(kAlarmState), 3u);
}

TEST(SysfsSource, AnUnreadableLedIsListedWithoutState) {
  TempDir tree;
  addLed(tree, "a:blue:broken-trigger", std::nullopt, "1");
  std::filesystem::create_directories(tree.file("a:blue:broken-trigger/trigger"));
  addLed(tree, "b:blue:fine", "[none]", "1");
  const auto nodes = SysfsLedSource(tree.path()).readNodes();
  ASSERT_EQ(nodes.size(), 2u);
  EXPECT_EQ(nodes[0].status, 0u);
  EXPECT_TRUE(nodes[0].properties.empty());
  EXPECT_EQ(nodes[1].status, 1u);
}

TEST(SysfsSource, AnUnreadableBrightnessFileWithoutPermission) {
  TempDir tree;
  addLed(tree, "x:blue:y", "[none]", "1");
  const std::string brightness = tree.file("x:blue:y/brightness");
  ASSERT_EQ(::chmod(brightness.c_str(), 0), 0);
  // The kernel refuses a file of mode 0 to everyone but root; the refusal is injected, so that
  // the test means the same whoever runs it.
  const auto files = FakeFileSystem::overRealFiles();
  files->fail(Call::Open, brightness, EACCES);
  const auto nodes = SysfsLedSource(tree.path(), files).readNodes();
  ASSERT_EQ(nodes.size(), 1u);
  EXPECT_EQ(nodes[0].status, 0u);
  EXPECT_EQ(files->count(Call::Open, brightness), 1u);
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(SysfsSource, ATriggerFileThatFailsWhileBeingReadLeavesTheStateUnknown) {
  TempDir tree;
  addLed(tree, "a:blue:broken", "[timer]", "1");
  addLed(tree, "b:blue:fine", "[timer]", "1");
  const auto files = FakeFileSystem::overRealFiles();
  files->fail(Call::Read, tree.file("a:blue:broken/trigger"), EIO);
  const auto nodes = SysfsLedSource(tree.path(), files).readNodes();
  ASSERT_EQ(nodes.size(), 2u);
  EXPECT_EQ(nodes[0].status, 0u);
  EXPECT_TRUE(nodes[0].properties.empty());
  EXPECT_EQ(nodes[1].property(kAlarmState), 3u);
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(SysfsSource, AnLedThatGoesAfterTheListingIsLeftOut) {
  TempDir tree;
  addLed(tree, "a:blue:unplugged", "[none]", "1");
  addLed(tree, "b:blue:here", "[none]", "1");
  const auto files = FakeFileSystem::overRealFiles();
  files->fail(Call::StatAt, tree.file("a:blue:unplugged"), ENOENT);
  const auto nodes = SysfsLedSource(tree.path(), files).readNodes();
  ASSERT_EQ(nodes.size(), 1u);
  EXPECT_EQ(nodes[0].path, "b:blue:here");
}

TEST(SysfsSource, AClassFolderThatCannotBeOpenedOrListedIsThrown) {
  const auto files = std::make_shared<FakeFileSystem>();
  files->addDirectory("/sys/class/leds");
  files->fail(Call::OpenDirectory, "/sys/class/leds", EACCES, 1);
  files->fail(Call::List, "/sys/class/leds", EIO, 1);
  const SysfsLedSource source("/sys/class/leds", files);
  for (const std::string expected : {"Permission denied", "Input/output error"}) {
    try {
      source.readNodes();
      ADD_FAILURE() << "no exception for " << expected;
    } catch (const SourceError& error) {
      EXPECT_EQ(std::string(error.what()), expected);
    }
  }
  EXPECT_TRUE(source.readNodes().empty());
  EXPECT_EQ(files->openDescriptors(), 0u);
}

// The layout of the kernel's class folder: links into the device tree, one of them dangling,
// attributes that report a size of 4096 whatever they hold.
TEST(SysfsSource, AnInMemoryClassFolderLikeTheKernels) {
  const auto files = std::make_shared<FakeFileSystem>();
  const std::string device = "/sys/devices/platform/leds/leds/";
  files->addFile(device + "server:blue:uid/trigger", "none timer [heartbeat]\n");
  files->addFile(device + "server:blue:uid/brightness", "0\n");
  files->addFile(device + "chassis::locate/brightness", "255\n");
  files->addFile(device + "input3::capslock/brightness", "1\n");
  for (const std::string led : {"server:blue:uid", "chassis::locate", "input3::capslock"}) {
    files->addSymlink("/sys/class/leds/" + led, "../../devices/platform/leds/leds/" + led);
    files->changeStatus(device + led + "/brightness",
                        [](struct stat& info) { info.st_size = 4096; });
  }
  files->addSymlink("/sys/class/leds/gone:blue:uid", "../../devices/platform/gone");
  const auto nodes = SysfsLedSource("/sys/class/leds", files).readNodes();
  ASSERT_EQ(nodes.size(), 2u);
  EXPECT_EQ(nodes[0].path, "chassis::locate");
  EXPECT_EQ(nodes[0].property(kAlarmState), 2u);
  EXPECT_EQ(nodes[1].path, "server:blue:uid");
  EXPECT_EQ(nodes[1].property(kAlarmState), 3u);
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(SysfsSource, AnEmptyClassFolderHasNoLights) {
  TempDir tree;
  EXPECT_TRUE(SysfsLedSource(tree.path()).readNodes().empty());
}

TEST(SysfsSource, ThroughTheCursor) {
  TempDir tree;
  addLed(tree, "b:blue:status", "[timer]", "0");
  addLed(tree, "a::identify", "[none]", "0");
  addLed(tree, "c::capslock", "[none]", "1");
  ScopedEnv source("KESTA_INSTRUMENTATION", "sysfs:" + tree.path());
  Instrumentation cursor;
  ASSERT_TRUE(cursor.selectNode(kBlueLight));
  unsigned int state = 0;
  EXPECT_EQ(cursor.convertPathToString(cursor.getPathToNode()), "a::identify");
  EXPECT_EQ(cursor.getNodeDescription(), "Blue Light");
  EXPECT_EQ(cursor.getNodeStatus(), 1u);
  EXPECT_TRUE(cursor.getProperty(kAlarmState, state));
  EXPECT_EQ(state, 1u);
  ++cursor;
  EXPECT_EQ(cursor.getPathToNode(), "b:blue:status");
  EXPECT_TRUE(cursor.getProperty(kAlarmState, state));
  EXPECT_EQ(state, 3u);
  ++cursor;
  EXPECT_FALSE(static_cast<bool>(cursor));
}

TEST(SysfsSource, AMissingFolderIsLoggedAndThrown) {
  TempDir tree;
  const std::string missing = tree.file("leds");
  LogCapture capture;
  ScopedEnv source("KESTA_INSTRUMENTATION", "sysfs:" + missing);
  std::string what;
  try {
    Instrumentation cursor;
  } catch (const std::exception& error) {
    what = error.what();
  }
  EXPECT_EQ(what, "Instrumentation source \"sysfs:" + missing +
                      "\" (from KESTA_INSTRUMENTATION) cannot be read: No such file or directory");
  EXPECT_EQ(platform_test::rawLines(capture),
            (std::vector<std::string>{"Kesta.Platform.Instrumentation\t6000\tLOG\t" + what}));
}

TEST(SysfsSource, AFileInsteadOfAFolderIsLoggedAndThrown) {
  TempDir tree;
  writeFileIn(tree.file("leds"), "");
  LogCapture capture;
  ScopedEnv source("KESTA_INSTRUMENTATION", "sysfs:" + tree.file("leds"));
  EXPECT_THROW(Instrumentation cursor, std::exception);
  ASSERT_EQ(platform_test::rawLines(capture).size(), 1u);
  EXPECT_NE(platform_test::rawLines(capture)[0].find("cannot be read: Not a directory"),
            std::string::npos);
}

struct NameCase {
  std::string name;
  std::string device;
  std::string colour;
  std::string function;
  bool blue;
};

class SysfsNames : public ::testing::TestWithParam<NameCase> {};

TEST_P(SysfsNames, SplitAndClassify) {
  const NameCase& c = GetParam();
  const auto parts = splitLedName(c.name);
  EXPECT_EQ(parts.device, c.device);
  EXPECT_EQ(parts.colour, c.colour);
  EXPECT_EQ(parts.function, c.function);
  EXPECT_EQ(isBlueLight(parts), c.blue) << c.name;
}

INSTANTIATE_TEST_SUITE_P(
    Table, SysfsNames,
    ::testing::Values(NameCase{"input3::capslock", "input3", "", "capslock", false},
                      NameCase{"platform::mute", "platform", "", "mute", false},
                      NameCase{"acpi0::power", "acpi0", "", "power", false},
                      NameCase{"blue:status", "", "blue", "status", true},
                      NameCase{"Blue:heartbeat", "", "Blue", "heartbeat", true},
                      NameCase{"uid", "", "", "uid", true},
                      NameCase{"mmc0::", "mmc0", "", "", false},
                      NameCase{"sys::identify", "sys", "", "identify", true},
                      NameCase{"sys:amber:identification", "sys", "amber", "identification", true},
                      NameCase{"sys::LOCATE", "sys", "", "LOCATE", true},
                      NameCase{"sys::locator-2", "sys", "", "locator-2", true},
                      NameCase{"sys::front_uid", "sys", "", "front_uid", true},
                      NameCase{"sys::indicator-id", "sys", "", "indicator-id", false},
                      NameCase{"sys::fluid", "sys", "", "fluid", false},
                      NameCase{"sys:bluegreen:x", "sys", "bluegreen", "x", false},
                      NameCase{"0000:03:00.0:blue:x", "0000:03:00.0", "blue", "x", true},
                      NameCase{"", "", "", "", false}));

TEST(SysfsSource, AlarmStateRules) {
  EXPECT_EQ(ledAlarmState("default-on", std::nullopt), 2u);
  EXPECT_EQ(ledAlarmState("timer", std::nullopt), 3u);
  EXPECT_EQ(ledAlarmState("none", 0ul), 1u);
  EXPECT_EQ(ledAlarmState("none", 3ul), 2u);
  EXPECT_EQ(ledAlarmState("usbport", std::nullopt), std::nullopt);
}

TEST(SysfsSource, NameOfTheSource) {
  EXPECT_EQ(SysfsLedSource("/sys/class/leds").name(), "sysfs:/sys/class/leds");
}

// ---- Which LEDs: lights=identify ----------------------------------------------------------------

TEST(SysfsSource, IdentifyLedsAreTheIdentificationHalfOfTheRule) {
  EXPECT_TRUE(isIdentifyLed(splitLedName("platform::identify")));
  EXPECT_TRUE(isIdentifyLed(splitLedName("0000:03:00.0:enclosure:locate")));
  EXPECT_TRUE(isIdentifyLed(splitLedName("uid")));
  EXPECT_TRUE(isIdentifyLed(splitLedName("x:blue:chassis_locate")));
  EXPECT_FALSE(isIdentifyLed(splitLedName("x:blue:status")));
  EXPECT_FALSE(isIdentifyLed(splitLedName("input3::capslock")));
  EXPECT_TRUE(isBlueLight(splitLedName("x:blue:status")));
}

TEST(SysfsSource, OnlyIdentifyLedsWithLightsIdentify) {
  TempDir tree;
  addLed(tree, "a:blue:status", "[none]", "1");
  addLed(tree, "b::locate", "[none]", "0");
  addLed(tree, "c::capslock", "[none]", "1");
  const auto identify = makeSysfsLedSource(tree.path() + "?lights=identify", systemFileSystem());
  EXPECT_EQ(identify->name(), "sysfs:" + tree.path() + "?lights=identify");
  const auto nodes = identify->readNodes();
  ASSERT_EQ(nodes.size(), 1u);
  EXPECT_EQ(nodes[0].path, "b::locate");
  const auto both =
      makeSysfsLedSource(tree.path() + "?lights=Blue-Or-Identify", systemFileSystem());
  EXPECT_EQ(both->name(), "sysfs:" + tree.path());
  EXPECT_EQ(both->readNodes().size(), 2u);
}

TEST(SysfsSource, TheDefaultFolderWithOptions) {
  EXPECT_EQ(makeSysfsLedSource("?lights=identify", systemFileSystem())->name(),
            "sysfs:/sys/class/leds?lights=identify");
  EXPECT_EQ(makeSysfsLedSource("", systemFileSystem())->name(), "sysfs:/sys/class/leds");
}

TEST(SysfsSource, UnknownOptionsAndValuesAreRefused) {
  const auto refusal = [](const std::string& rest) {
    try {
      makeSysfsLedSource(rest, systemFileSystem());
    } catch (const SourceError& error) {
      return std::string(error.what());
    }
    return std::string("no refusal");
  };
  EXPECT_EQ(refusal("/x?lights=all"),
            "lights=all must be lights=identify or lights=blue-or-identify");
  EXPECT_EQ(refusal("/x?colour=blue"), "unknown option \"colour\" (expected lights)");
  EXPECT_EQ(refusal("/x?lights"), "the options after '?' must be name=value pairs joined by '&'");
  EXPECT_EQ(refusal("/x?lights=identify&lights=identify"), "the option \"lights\" is given twice");
}

}  // namespace
