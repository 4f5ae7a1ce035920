// Lists of sources and "auto": the entries a list is read as, one walk over several sources with
// each failure logged and left out, IDs kept apart, and what auto finds on a machine (a fake file
// system and a fake IPMI device stand in for /sys and /dev).
#include <fcntl.h>
#include <gtest/gtest.h>
#include <linux/ipmi.h>
#include <sys/ioctl.h>

#include <memory>
#include <string>
#include <vector>

#include "FakeFileSystem.h"
#include "KestaInstrumentation.h"
#include "PlatformTestSupport.h"
#include "instrumentation/SourceList.h"
#include "instrumentation/ipmi/IpmiDeviceTransport.h"

namespace {

using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::discoveryRoots;
using Kesta::platform::DiscoveryRoots;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::IpmiDeviceOs;
using Kesta::platform::isSourceList;
using Kesta::platform::keepDeviceIdsApart;
using Kesta::platform::parseSourceList;
using Kesta::platform::readSourceList;
using Kesta::platform::setConfigurationFileForTesting;
using Kesta::platform::SourceListReading;
using Kesta::platform::SourceOutcome;
using State = Kesta::platform::SourceOutcome::State;
using Kesta::platform::SourceSetting;
using Kesta::platform::SourceSystem;
using platform_test::FakeFileSystem;
using platform_test::writeFileIn;
using testsupport::LogCapture;
using testsupport::LogLine;
using testsupport::Node;
using testsupport::ScopedEnv;
using testsupport::TempDir;
using testsupport::writeTree;

constexpr auto kBlueLight = NodeLexicon::NODE_TYPE_BLUE_LIGHT;
constexpr auto kAlarmState = NodeLexicon::PROPERTY_ALARM_STATE;
const std::string kCategory = "Kesta.Platform.Instrumentation";

LogLine failure(const std::string& text) { return {kCategory, 6000, "LOG", text}; }

InstrumentationNode light(const std::string& description, const std::string& path,
                          unsigned int status = 1, unsigned int alarmState = 2) {
  InstrumentationNode node;
  node.type = kBlueLight;
  node.description = description;
  node.path = path;
  node.status = status;
  node.properties.push_back({kAlarmState, alarmState});
  return node;
}

std::vector<std::string> pathsOf(const std::vector<InstrumentationNode>& nodes) {
  std::vector<std::string> paths;
  paths.reserve(nodes.size());
  for (const InstrumentationNode& node : nodes) paths.push_back(node.path);
  return paths;
}

// A BMC behind the kernel's IPMI device that answers every Get Chassis Status with the identify
// light on until switched off. Enough for auto to read a light through it; the transport itself
// is ipmi_device_transport_test's.
class AnsweringBmc final : public IpmiDeviceOs {
 public:
  int open(const char* path, int) override {
    opened.emplace_back(path);
    return 7;
  }
  int close(int) override { return 0; }
  int ioctl(int, unsigned long request, void* argument) override {
    if (request == IPMICTL_SEND_COMMAND) {
      msgid_ = static_cast<ipmi_req*>(argument)->msgid;
      return 0;
    }
    if (request == IPMICTL_RECEIVE_MSG_TRUNC) {
      auto& received = *static_cast<ipmi_recv*>(argument);
      received.recv_type = IPMI_RESPONSE_RECV_TYPE;
      received.msgid = msgid_;
      received.msg.netfn = 0x01;
      received.msg.cmd = 0x01;
      // Completion code, power on, no last event, identify reported and on indefinitely.
      const unsigned char answer[] = {0x00, 0x01, 0x00, 0x60};
      std::copy(std::begin(answer), std::end(answer), received.msg.data);
      received.msg.data_len = sizeof answer;
      return 0;
    }
    return -ENOTTY;
  }
  int poll(struct pollfd* fds, nfds_t, int) override {
    fds[0].revents = POLLIN;
    return 1;
  }

  std::vector<std::string> opened;

 private:
  long msgid_ = 0;
};

// ---- The entries of a list ---------------------------------------------------------------------

TEST(SourceListText, StatesHaveNames) {
  EXPECT_STREQ(toString(State::Absent), "absent");
  EXPECT_STREQ(toString(State::Unreadable), "unreadable");
  EXPECT_STREQ(toString(State::Repeated), "repeated");
  EXPECT_STREQ(toString(State::Read), "read");
}

TEST(SourceListText, ASingleSourceIsAListOfOne) {
  const auto parsed = parseSourceList(" file:/a.json ");
  EXPECT_EQ(parsed.entries, std::vector<std::string>{"file:/a.json"});
  EXPECT_TRUE(parsed.notes.empty());
}

TEST(SourceListText, AutoAndTextsWithASemicolonAreLists) {
  EXPECT_TRUE(isSourceList("auto"));
  EXPECT_TRUE(isSourceList("AUTO"));
  EXPECT_TRUE(isSourceList("file:/a;file:/b"));
  EXPECT_TRUE(isSourceList("ipmi:;"));
  EXPECT_FALSE(isSourceList("file:/a"));
  EXPECT_FALSE(isSourceList("sysfs:"));
  EXPECT_FALSE(isSourceList("automatic:"));
}

TEST(SourceListText, EntriesAreSplitAtSemicolonsWithoutTheirBlanks) {
  const auto parsed = parseSourceList(" ipmi: ;\tenclosure:; sysfs:/x ");
  EXPECT_EQ(parsed.entries, (std::vector<std::string>{"ipmi:", "enclosure:", "sysfs:/x"}));
  EXPECT_TRUE(parsed.notes.empty());
}

TEST(SourceListText, EmptyEntriesAreLeftOutWithOneNote) {
  EXPECT_EQ(parseSourceList("file:/a;;file:/b; ;").entries,
            (std::vector<std::string>{"file:/a", "file:/b"}));
  EXPECT_EQ(parseSourceList("file:/a;;file:/b; ;").notes,
            std::vector<std::string>{"has 3 empty entries (entries 2, 4, 5); left out"});
  EXPECT_EQ(parseSourceList("file:/a;").notes,
            std::vector<std::string>{"has 1 empty entry (entry 2); left out"});
}

TEST(SourceListText, RepeatedEntriesAreReadOnceWithOneNote) {
  const auto parsed = parseSourceList("file:/a;file:/b; file:/a ;file:/a;auto;auto");
  EXPECT_EQ(parsed.entries, (std::vector<std::string>{"file:/a", "file:/b", "auto"}));
  EXPECT_EQ(parsed.notes, std::vector<std::string>{"repeats 3 entries (\"file:/a\", \"file:/a\", "
                                                   "\"auto\"); each source is read once"});
}

TEST(SourceListText, AThousandEntriesAreCutToTheFirstSixtyFour) {
  std::string text;
  for (int i = 0; i < 1000; ++i) text += (i == 0 ? "" : ";") + ("file:/tree" + std::to_string(i));
  const auto parsed = parseSourceList(text);
  ASSERT_EQ(parsed.entries.size(), 64u);
  EXPECT_EQ(parsed.entries.front(), "file:/tree0");
  EXPECT_EQ(parsed.entries.back(), "file:/tree63");
  EXPECT_EQ(parsed.notes,
            std::vector<std::string>{"names 1000 sources; only the first 64 are read"});
}

TEST(SourceListText, AListOfNothingButSemicolons) {
  const auto parsed = parseSourceList(std::string(999, ';'));
  EXPECT_TRUE(parsed.entries.empty());
  EXPECT_EQ(parsed.notes,
            std::vector<std::string>{
                "has 1000 empty entries (entries 1, 2, 3, 4, 5 and 995 more); left out"});
}

TEST(SourceListText, ControlCharactersInARepeatedEntryStayOnOneLine) {
  const auto parsed = parseSourceList("file:/a\nb;file:/a\nb");
  EXPECT_EQ(parsed.notes, std::vector<std::string>{
                              "repeats 1 entry (\"file:/a\\x0Ab\"); each source is read once"});
}

// ---- One walk over several sources -------------------------------------------------------------

class SourceListWalk : public ::testing::Test {
 protected:
  SourceListReading read(const std::string& text,
                         const std::string& origin = "KESTA_INSTRUMENTATION") {
    return readSourceList(SourceSetting{text, origin}, SourceSystem{}, DiscoveryRoots{});
  }
  std::string tree(const std::string& name, const std::vector<Node>& nodes) {
    std::string file = dir_.file(name);
    writeTree(file, nodes);
    return file;
  }

  TempDir dir_;
  LogCapture log_;
};

TEST_F(SourceListWalk, SourcesAreReadInTheirOrder) {
  const std::string a = tree("a.json", {{26, "1.1", "Front Light", 1, {{1, 2}}}});
  const std::string b =
      tree("b.json", {{26, "2.1", "Rear Light", 1, {{1, 1}}}, {7, "2.2", "Temperature", 1, {}}});
  const SourceListReading reading = read("file:" + b + ";file:" + a);
  EXPECT_EQ(pathsOf(reading.nodes), (std::vector<std::string>{"2.1", "2.2", "1.1"}));
  ASSERT_EQ(reading.outcomes.size(), 2u);
  EXPECT_EQ(reading.outcomes[0].text, "file:" + b);
  EXPECT_EQ(reading.outcomes[0].listedAs, "file:" + b);
  EXPECT_EQ(reading.outcomes[0].state, State::Read);
  EXPECT_EQ(reading.outcomes[0].lights, 1u);
  EXPECT_EQ(reading.outcomes[1].lights, 1u);
  EXPECT_TRUE(log_.lines(kCategory).empty());
}

TEST_F(SourceListWalk, AFailingSourceWritesItsLineAndTheOthersStillGiveTheirs) {
  const std::string good = tree("good.json", {{26, "1.1", "Front Light", 1, {{1, 2}}}});
  const std::string missing = dir_.file("missing.json");
  const SourceListReading reading =
      read("file:" + missing + ";bogus:x;file:" + good, "/etc/kesta/instrumentation.conf");
  EXPECT_EQ(pathsOf(reading.nodes), std::vector<std::string>{"1.1"});
  EXPECT_EQ(log_.lines(kCategory),
            (std::vector<LogLine>{
                failure("Instrumentation source \"file:" + missing +
                        "\" (from /etc/kesta/instrumentation.conf) cannot be read: No such file or "
                        "directory"),
                failure("Instrumentation source \"bogus:x\" (from /etc/kesta/instrumentation.conf) "
                        "cannot be read: unknown kind of source (expected file:<path>, "
                        "sysfs:<directory>, enclosure:[<directory>], ipmi:[<device>], "
                        "ipmi-lan:<host>?credentials=<file> or "
                        "redfish:https://<host>?credentials=<file>)")}));
  ASSERT_EQ(reading.outcomes.size(), 3u);
  EXPECT_EQ(reading.outcomes[0].state, State::Unreadable);
  EXPECT_EQ(reading.outcomes[0].why, "No such file or directory");
  EXPECT_EQ(reading.outcomes[0].lights, 0u);
  EXPECT_EQ(reading.outcomes[1].state, State::Unreadable);
  EXPECT_EQ(reading.outcomes[2].state, State::Read);
}

TEST_F(SourceListWalk, EveryFailingSourceGivesAnEmptyWalkNotAFailure) {
  const SourceListReading reading = read("file:" + dir_.file("a") + ";file:" + dir_.file("b"));
  EXPECT_TRUE(reading.nodes.empty());
  EXPECT_EQ(log_.lines(kCategory).size(), 2u);
}

TEST_F(SourceListWalk, TheListsOwnNotesAreLoggedOnce) {
  const std::string good = tree("good.json", {{26, "1.1", "Front Light", 1, {{1, 2}}}});
  const SourceListReading reading = read(";file:" + good + ";file:" + good);
  EXPECT_EQ(pathsOf(reading.nodes), std::vector<std::string>{"1.1"});
  EXPECT_EQ(log_.lines(kCategory),
            (std::vector<LogLine>{
                failure("Instrumentation source list (from KESTA_INSTRUMENTATION) has 1 empty "
                        "entry (entry 1); left out"),
                failure("Instrumentation source list (from KESTA_INSTRUMENTATION) repeats 1 entry "
                        "(\"file:" +
                        good + "\"); each source is read once")}));
  EXPECT_EQ(reading.notes.size(), 2u);
}

TEST_F(SourceListWalk, TwoNamesForOneSourceReadItOnce) {
  std::filesystem::create_directories(dir_.file("leds/x::identify"));
  writeFileIn(dir_.file("leds/x::identify/brightness"), "1\n");
  const std::string leds = dir_.file("leds");
  const SourceListReading reading =
      read("sysfs:" + leds + ";sysfs:" + leds + "?lights=blue-or-identify");
  EXPECT_EQ(pathsOf(reading.nodes), std::vector<std::string>{"x::identify"});
  ASSERT_EQ(reading.outcomes.size(), 2u);
  EXPECT_EQ(reading.outcomes[1].state, State::Repeated);
  EXPECT_EQ(reading.outcomes[1].why, "the same source as \"sysfs:" + leds + "\"; read once");
  EXPECT_EQ(log_.lines(kCategory),
            std::vector<LogLine>{failure("Instrumentation source \"sysfs:" + leds +
                                         "?lights=blue-or-identify\" (from KESTA_INSTRUMENTATION) "
                                         "is the same source as \"sysfs:" +
                                         leds + "\"; it is read once")});
}

TEST_F(SourceListWalk, AThousandMissingFilesCostSixtyFourReadsAndNoCrash) {
  std::string text;
  for (int i = 0; i < 1000; ++i)
    text += (i == 0 ? "" : ";") + ("file:" + dir_.file(std::to_string(i)));
  const SourceListReading reading = read(text);
  EXPECT_TRUE(reading.nodes.empty());
  EXPECT_EQ(reading.outcomes.size(), 64u);
  const auto lines = log_.lines(kCategory);
  ASSERT_EQ(lines.size(), 65u);
  EXPECT_EQ(lines.front().text,
            "Instrumentation source list (from KESTA_INSTRUMENTATION) names 1000 sources; only "
            "the first 64 are read");
}

// ---- IDs kept apart
// ------------------------------------------------------------------------------

TEST(DeviceIds, TheSameIdTwiceGetsANumberAfterItsPath) {
  std::vector<InstrumentationNode> nodes = {light("Blue Light", "1.2"), light("Blue Light", "1.2"),
                                            light("Blue Light", "1.3"), light("Blue Light", "1.2")};
  keepDeviceIdsApart(nodes);
  EXPECT_EQ(pathsOf(nodes), (std::vector<std::string>{"1.2", "1.2 #2", "1.3", "1.2 #3"}));
}

TEST(DeviceIds, ANumberAlreadyTakenIsSkipped) {
  std::vector<InstrumentationNode> nodes = {
      light("Blue Light", "1.2"), light("Blue Light", "1.2 #2"), light("Blue Light", "1.2")};
  keepDeviceIdsApart(nodes);
  EXPECT_EQ(pathsOf(nodes), (std::vector<std::string>{"1.2", "1.2 #2", "1.2 #3"}));
}

TEST(DeviceIds, IdsAreComparedAsTheModuleMakesThem) {
  // The module takes "<description>:<path>" without its surrounding blanks, so blanks at either
  // end and a colon on either side of the join make the same ID.
  std::vector<InstrumentationNode> nodes = {
      light(" Blue Light", "1.2"), light("Blue Light", "1.2 "), light("Blue Light:x", "1.2"),
      light("Blue Light", "x:1.2")};
  keepDeviceIdsApart(nodes);
  EXPECT_EQ(pathsOf(nodes), (std::vector<std::string>{"1.2", "1.2  #2", "1.2", "x:1.2 #2"}));
}

TEST(DeviceIds, OnlyBlueLightsTakePart) {
  InstrumentationNode other = light("Blue Light", "1.2");
  other.type = 7;
  std::vector<InstrumentationNode> nodes = {other, light("Blue Light", "1.2"), other};
  keepDeviceIdsApart(nodes);
  EXPECT_EQ(pathsOf(nodes), (std::vector<std::string>{"1.2", "1.2", "1.2"}));
}

TEST_F(SourceListWalk, TheSameTreeTwiceUnderTwoNamesGivesDistinctIds) {
  const std::string a = tree("a.json", {{26, "1.2", "Blue Light", 1, {{1, 2}}}});
  const std::string b = tree("b.json", {{26, "1.2", "Blue Light", 1, {{1, 3}}}});
  const SourceListReading reading = read("file:" + a + ";file:" + b);
  EXPECT_EQ(pathsOf(reading.nodes), (std::vector<std::string>{"1.2", "1.2 #2"}));
  // The same walk again gives the same IDs.
  EXPECT_EQ(pathsOf(read("file:" + a + ";file:" + b).nodes), pathsOf(reading.nodes));
}

// ---- auto
// ----------------------------------------------------------------------------------------

class AutoSources : public ::testing::Test {
 protected:
  SourceListReading readAuto() {
    return readSourceList(SourceSetting{"auto", "default"},
                          SourceSystem{files_, steadyClock(), bmc_}, DiscoveryRoots{});
  }
  static std::shared_ptr<const Kesta::platform::Clock> steadyClock() {
    return Kesta::platform::steadyClock();
  }
  void addLed(const std::string& name, const std::string& brightness) {
    files_->addDirectory("/sys/class/leds/" + name);
    files_->addFile("/sys/class/leds/" + name + "/brightness", brightness + "\n");
  }

  std::shared_ptr<FakeFileSystem> files_ = std::make_shared<FakeFileSystem>();
  std::shared_ptr<AnsweringBmc> bmc_ = std::make_shared<AnsweringBmc>();
  LogCapture log_;
};

TEST_F(AutoSources, AMachineWithoutAnyGivesNoLightAndNoLine) {
  const SourceListReading reading = readAuto();
  EXPECT_TRUE(reading.nodes.empty());
  EXPECT_TRUE(log_.lines(kCategory).empty());
  ASSERT_EQ(reading.outcomes.size(), 3u);
  for (const SourceOutcome& outcome : reading.outcomes) {
    EXPECT_EQ(outcome.state, State::Absent) << outcome.text;
    EXPECT_EQ(outcome.listedAs, "auto");
  }
  EXPECT_EQ(reading.outcomes[0].text, "ipmi:");
  EXPECT_EQ(reading.outcomes[0].why,
            "no IPMI device (looked for /dev/ipmi0, /dev/ipmi/0, /dev/ipmidev/0)");
  EXPECT_EQ(reading.outcomes[1].text, "enclosure:");
  EXPECT_EQ(reading.outcomes[1].why, "no /sys/class/enclosure");
  EXPECT_EQ(reading.outcomes[2].text, "sysfs:?lights=identify");
  EXPECT_EQ(reading.outcomes[2].why, "no /sys/class/leds");
  EXPECT_TRUE(bmc_->opened.empty());
}

TEST_F(AutoSources, TheBmcAndTheIdentifyLedsAreFound) {
  files_->addFile("/dev/ipmi/0", "");
  addLed("b::identify", "0");
  addLed("a:blue:status", "1");  // blue, but it identifies nothing
  addLed("c::capslock", "1");
  const SourceListReading reading = readAuto();
  EXPECT_EQ(bmc_->opened, std::vector<std::string>{"/dev/ipmi/0"});
  ASSERT_EQ(reading.nodes.size(), 2u);
  EXPECT_EQ(reading.nodes[0], light("Blue Light", "ipmi:/dev/ipmi/0", 1, 3));
  EXPECT_EQ(reading.nodes[1], light("Blue Light", "b::identify", 1, 1));
  ASSERT_EQ(reading.outcomes.size(), 3u);
  EXPECT_EQ(reading.outcomes[0].text, "ipmi:/dev/ipmi/0");
  EXPECT_EQ(reading.outcomes[0].lights, 1u);
  EXPECT_EQ(reading.outcomes[1].state, State::Absent);
  EXPECT_EQ(reading.outcomes[2].text, "sysfs:/sys/class/leds?lights=identify");
  EXPECT_EQ(reading.outcomes[2].lights, 1u);
  EXPECT_TRUE(log_.lines(kCategory).empty());
}

TEST_F(AutoSources, TheFirstIpmiDeviceFoundIsTheOneRead) {
  files_->addFile("/dev/ipmi0", "");
  files_->addFile("/dev/ipmidev/0", "");
  readAuto();
  EXPECT_EQ(bmc_->opened, std::vector<std::string>{"/dev/ipmi0"});
}

TEST_F(AutoSources, APresentSourceThatCannotBeReadWritesItsLine) {
  files_->addFile("/dev/ipmi0", "");
  files_->addDirectory("/sys/class/leds");
  files_->fail(FakeFileSystem::Call::List, "/sys/class/leds", EACCES);
  const SourceListReading reading = readAuto();
  EXPECT_EQ(pathsOf(reading.nodes), std::vector<std::string>{"ipmi:/dev/ipmi0"});
  EXPECT_EQ(log_.lines(kCategory),
            std::vector<LogLine>{failure(
                "Instrumentation source \"sysfs:/sys/class/leds?lights=identify\" (from auto, "
                "default) cannot be read: Permission denied")});
  EXPECT_EQ(reading.outcomes[2].state, State::Unreadable);
  EXPECT_EQ(reading.outcomes[2].why, "Permission denied");
}

TEST_F(AutoSources, AnLedClassWithoutIdentifyLedsIsFoundAndGivesNothing) {
  addLed("input3::capslock", "0");
  const SourceListReading reading = readAuto();
  EXPECT_TRUE(reading.nodes.empty());
  EXPECT_EQ(reading.outcomes[2].state, State::Read);
  EXPECT_EQ(reading.outcomes[2].why, "no light");
  EXPECT_TRUE(log_.lines(kCategory).empty());
}

TEST_F(AutoSources, AutoInAListIsReadWhereItStands) {
  addLed("x::locate", "1");
  files_->addFile("/t/tree.json",
                  R"({"nodes": [{"type": 26, "path": "1.1", "description": "Front"}]})");
  const SourceListReading reading =
      readSourceList(SourceSetting{"file:/t/tree.json;auto", "KESTA_INSTRUMENTATION"},
                     SourceSystem{files_, steadyClock(), bmc_}, DiscoveryRoots{});
  EXPECT_EQ(pathsOf(reading.nodes), (std::vector<std::string>{"1.1", "x::locate"}));
  EXPECT_EQ(reading.outcomes.size(), 4u);
}

TEST_F(AutoSources, AnEntryThatAutoFindsTooIsReadOnce) {
  addLed("x::locate", "1");
  const SourceListReading reading = readSourceList(
      SourceSetting{"auto;sysfs:/sys/class/leds?lights=identify", "KESTA_INSTRUMENTATION"},
      SourceSystem{files_, steadyClock(), bmc_}, DiscoveryRoots{});
  EXPECT_EQ(pathsOf(reading.nodes), std::vector<std::string>{"x::locate"});
  ASSERT_EQ(log_.lines(kCategory).size(), 1u);
  EXPECT_EQ(
      log_.lines(kCategory)[0].text,
      "Instrumentation source \"sysfs:/sys/class/leds?lights=identify\" (from "
      "KESTA_INSTRUMENTATION) is the same source as \"sysfs:/sys/class/leds?lights=identify\"; "
      "it is read once");
}

TEST(DiscoveryRoots, TheRootVariablePrefixesEveryPath) {
  {
    ScopedEnv root("KESTA_DISCOVERY_ROOT", " /srv/copy ");
    const DiscoveryRoots roots = discoveryRoots();
    EXPECT_EQ(roots.ipmiDevices,
              (std::vector<std::string>{"/srv/copy/dev/ipmi0", "/srv/copy/dev/ipmi/0",
                                        "/srv/copy/dev/ipmidev/0"}));
    EXPECT_EQ(roots.enclosures, "/srv/copy/sys/class/enclosure");
    EXPECT_EQ(roots.leds, "/srv/copy/sys/class/leds");
  }
  {
    ScopedEnv root("KESTA_DISCOVERY_ROOT", "  ");
    EXPECT_EQ(discoveryRoots().leds, "/sys/class/leds");
  }
}

// ---- Through the cursor
// --------------------------------------------------------------------------

TEST(SourceListCursor, AListThroughTheCursorWalksEverySource) {
  TempDir dir;
  writeTree(dir.file("a.json"), {{26, "1.1", "Front Light", 1, {{1, 2}}}});
  std::filesystem::create_directories(dir.file("leds/x::identify"));
  writeFileIn(dir.file("leds/x::identify/brightness"), "0\n");
  LogCapture log;
  ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + dir.file("a.json") +
                                                " ; sysfs:" + dir.file("leds") +
                                                " ; file:" + dir.file("missing.json"));
  Instrumentation cursor;
  ASSERT_TRUE(cursor.selectNode(kBlueLight));
  std::vector<std::string> seen;
  for (; cursor; ++cursor)
    seen.push_back(cursor.getNodeDescription() + ":" + cursor.getPathToNode());
  EXPECT_EQ(seen, (std::vector<std::string>{"Front Light:1.1", "Blue Light:x::identify"}));
  EXPECT_EQ(log.lines(kCategory).size(), 1u);
}

TEST(SourceListCursor, WithNothingConfiguredAutoReadsTheRedirectedRoots) {
  TempDir dir;
  std::filesystem::create_directories(dir.file("sys/class/leds/platform::uid"));
  writeFileIn(dir.file("sys/class/leds/platform::uid/brightness"), "1\n");
  std::filesystem::create_directories(dir.file("sys/class/leds/platform:blue:power"));
  LogCapture log;
  ScopedEnv noVariable("KESTA_INSTRUMENTATION", std::nullopt);
  ScopedEnv root("KESTA_DISCOVERY_ROOT", dir.path());
  setConfigurationFileForTesting(dir.file("no-such.conf"));
  Instrumentation cursor;
  setConfigurationFileForTesting("");
  ASSERT_TRUE(cursor.selectNode(kBlueLight));
  EXPECT_EQ(cursor.getPathToNode(), "platform::uid");
  unsigned int state = 0;
  EXPECT_TRUE(cursor.getProperty(NodeLexicon::PROPERTY_ALARM_STATE, state));
  EXPECT_EQ(state, 2u);
  ++cursor;
  EXPECT_FALSE(cursor);
  EXPECT_TRUE(log.lines(kCategory).empty());
}

TEST(SourceListCursor, ASingleSourceStillFailsTheWalk) {
  TempDir dir;
  LogCapture log;
  ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + dir.file("missing.json"));
  EXPECT_THROW(Instrumentation(), std::exception);
  EXPECT_EQ(log.lines(kCategory).size(), 1u);
}

}  // namespace
