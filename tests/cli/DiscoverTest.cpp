// What `discover` writes about the sources and the lights, from given outcomes.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Discover.h"

namespace bluelight::cli {
namespace {

using Kesta::platform::SourceOutcome;
using State = Kesta::platform::SourceOutcome::State;

SourceOutcome outcome(const std::string& text, const std::string& listedAs, State state,
                      std::size_t lights, const std::string& why) {
  SourceOutcome result;
  result.text = text;
  result.listedAs = listedAs;
  result.state = state;
  result.lights = lights;
  result.why = why;
  return result;
}

DiscoveredSources autoOnAServer() {
  DiscoveredSources sources;
  sources.setting = {"auto", "default"};
  sources.outcomes = {
      outcome("ipmi:/dev/ipmi0", "auto", State::Read, 1, ""),
      outcome("enclosure:", "auto", State::Absent, 0, "no /sys/class/enclosure"),
      outcome("sysfs:/sys/class/leds?lights=identify", "auto", State::Read, 0, "no light")};
  return sources;
}

cmpihost::InstanceValue light(const std::string& deviceId, unsigned alarm, unsigned health) {
  cmpihost::InstanceValue instance;
  instance.set("DeviceID", cmpihost::Value(deviceId));
  instance.set("AlarmState", cmpihost::Value::uint16(static_cast<CMPIUint16>(alarm)));
  instance.set("HealthState", cmpihost::Value::uint16(static_cast<CMPIUint16>(health)));
  return instance;
}

TEST(Discover, TheSourcesOfAutoOneLineEach) {
  EXPECT_EQ(sourcesText(autoOnAServer()),
            "sources: auto (the default)\n"
            "  read       1 light    ipmi:/dev/ipmi0\n"
            "  absent     -          enclosure:  (no /sys/class/enclosure)\n"
            "  read       0 lights   sysfs:/sys/class/leds?lights=identify  (no light)\n");
}

TEST(Discover, AConfiguredListWithItsFailuresAndNotes) {
  DiscoveredSources sources;
  sources.setting = {"file:/a.json;bogus:;;sysfs:", "KESTA_INSTRUMENTATION"};
  sources.outcomes = {
      outcome("file:/a.json", "file:/a.json", State::Unreadable, 0, "No such file or directory"),
      outcome("bogus:", "bogus:", State::Unreadable, 0, "unknown kind of source"),
      outcome("sysfs:", "sysfs:", State::Read, 12, "")};
  sources.notes = {"has 1 empty entry (entry 3); left out"};
  EXPECT_EQ(sourcesText(sources),
            "sources: file:/a.json;bogus:;;sysfs: (from KESTA_INSTRUMENTATION)\n"
            "  unreadable -          file:/a.json  (No such file or directory)\n"
            "  unreadable -          bogus:  (unknown kind of source)\n"
            "  read       12 lights  sysfs:\n"
            "  note: the list has 1 empty entry (entry 3); left out\n");
}

TEST(Discover, AConfigurationThatCannotBeUsed) {
  DiscoveredSources sources;
  sources.settingProblem = "configuration file \"/etc/kesta/instrumentation.conf\" cannot be read";
  EXPECT_EQ(sourcesText(sources),
            "sources: the configuration cannot be used: configuration file "
            "\"/etc/kesta/instrumentation.conf\" cannot be read\n");
}

TEST(Discover, TheLightsWithTheirStatesInWords) {
  EXPECT_EQ(lightsText({light("Blue Light:ipmi:/dev/ipmi0", 3, 5), light("Bay:2", 1, 10),
                        light("Bay:3", 0, 0), light("Odd:4", 7, 30)}),
            "lights: 4\n"
            "  AlarmState      HealthState   DeviceID\n"
            "  3 alternating   5 OK          Blue Light:ipmi:/dev/ipmi0\n"
            "  1 off           10 degraded   Bay:2\n"
            "  0 unknown       0 unknown     Bay:3\n"
            "  7               30            Odd:4\n");
  EXPECT_EQ(lightsText({}), "lights: 0\n");
}

TEST(Discover, APropertyThatIsMissingShowsADash) {
  cmpihost::InstanceValue bare;
  bare.set("DeviceID", cmpihost::Value("X:1"));
  EXPECT_EQ(lightsText({bare}),
            "lights: 1\n"
            "  AlarmState      HealthState   DeviceID\n"
            "  -               -             X:1\n");
}

TEST(Discover, TheSourcesAsJson) {
  const Json json = jsonSources(autoOnAServer());
  EXPECT_EQ(
      json.dump(),
      R"({"setting":{"text":"auto","origin":"default","problem":null},"sources":[)"
      R"({"source":"ipmi:/dev/ipmi0","listedAs":"auto","state":"read","lights":1,"why":null},)"
      R"({"source":"enclosure:","listedAs":"auto","state":"absent","lights":0,)"
      R"("why":"no /sys/class/enclosure"},)"
      R"({"source":"sysfs:/sys/class/leds?lights=identify","listedAs":"auto","state":"read",)"
      R"("lights":0,"why":"no light"}],"notes":[]})");
}

TEST(Discover, ThePropertiesAskedOfTheProvider) {
  EXPECT_EQ(discoveredProperties(),
            (std::vector<std::string>{"DeviceID", "ElementName", "AlarmState", "HealthState",
                                      "OperationalStatus"}));
}

}  // namespace
}  // namespace bluelight::cli
