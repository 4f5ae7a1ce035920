// What the Redfish source reads out of an answer and the node a chassis or drive becomes: tables
// of answers and what each gives. No network: the answers are written here.
#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <vector>

#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/redfish/RedfishResources.h"

namespace {

using Kesta::platform::InstrumentationNode;
using Kesta::platform::isRedfishServicePath;
using Kesta::platform::OnReport;
using Kesta::platform::readRedfishChassis;
using Kesta::platform::readRedfishCollection;
using Kesta::platform::readRedfishDrive;
using Kesta::platform::readRedfishServiceRoot;
using Kesta::platform::readRedfishStorage;
using Kesta::platform::RedfishAnswerError;
using Kesta::platform::RedfishChassis;
using Kesta::platform::redfishLightNode;
using Kesta::platform::RedfishLightResource;

constexpr unsigned int kNoAlarmState = 0;  // in the tables: the node has no alarm state

// What a node says of its light: status and alarm state, or that there is no node.
struct Light {
  bool listed = false;
  unsigned int status = 0;
  unsigned int alarmState = kNoAlarmState;
  std::string problem;
};

bool operator==(const Light& a, const Light& b) {
  return a.listed == b.listed && a.status == b.status && a.alarmState == b.alarmState &&
         a.problem == b.problem;
}

std::ostream& operator<<(std::ostream& out, const Light& light) {
  if (!light.listed) {
    return out << "(no light)";
  }
  return out << "status " << light.status << ", alarm state " << light.alarmState << ", problem \""
             << light.problem << "\"";
}

Light lightOf(const RedfishLightResource& resource, OnReport onReport = OnReport::Alternating) {
  std::string problem = "(not emptied)";
  const std::optional<InstrumentationNode> node = redfishLightNode(
      resource, "redfish:bmc:443/redfish/v1/Chassis/1", "Front", onReport, problem);
  Light light;
  light.problem = problem;
  if (node) {
    light.listed = true;
    EXPECT_EQ(node->type, 26u);
    EXPECT_EQ(node->path, "redfish:bmc:443/redfish/v1/Chassis/1");
    EXPECT_EQ(node->description, "Front");
    light.status = node->status;
    light.alarmState = node->property(1).value_or(kNoAlarmState);
  }
  return light;
}

Light listed(unsigned int status, unsigned int alarmState, std::string problem = "") {
  return {true, status, alarmState, std::move(problem)};
}
const Light kNoLight = {false, 0, 0, ""};

std::string answerError(void (*read)(const std::string&), const std::string& body) {
  try {
    read(body);
  } catch (const RedfishAnswerError& error) {
    return error.what();
  }
  return "(accepted)";
}

struct ChassisRow {
  std::string members;  // JSON members of the chassis, without braces
  Light alternating;    // with on=alternating
  Light steady;         // with on=steady
};

TEST(RedfishChassisLight, EachStateAndHealthAsANode) {
  const std::vector<ChassisRow> rows = {
      {R"("LocationIndicatorActive": false)", listed(1, 1), listed(1, 1)},
      {R"("LocationIndicatorActive": true)", listed(1, 3), listed(1, 2)},
      {R"("IndicatorLED": "Off")", listed(1, 1), listed(1, 1)},
      {R"("IndicatorLED": "Blinking")", listed(1, 3), listed(1, 2)},
      {R"("IndicatorLED": "Lit")", listed(1, 2), listed(1, 2)},
      // The newer property wins over the older one when it holds a state.
      {R"("LocationIndicatorActive": false, "IndicatorLED": "Lit")", listed(1, 1), listed(1, 1)},
      {R"("IndicatorLED": "Blinking", "LocationIndicatorActive": false)", listed(1, 1),
       listed(1, 1)},
      {R"("LocationIndicatorActive": null, "IndicatorLED": "Blinking")", listed(1, 3),
       listed(1, 2)},
      // A state the service does not know at the moment.
      {R"("LocationIndicatorActive": null)", listed(0, kNoAlarmState), listed(0, kNoAlarmState)},
      {R"("IndicatorLED": null)", listed(0, kNoAlarmState), listed(0, kNoAlarmState)},
      {R"("IndicatorLED": "Unknown")", listed(0, kNoAlarmState), listed(0, kNoAlarmState)},
      // No light at all.
      {R"("Name": "Front")", kNoLight, kNoLight},
      {R"("Status": {"Health": "Critical"})", kNoLight, kNoLight},
      // Health.
      {R"("LocationIndicatorActive": true, "Status": {"State": "Enabled", "Health": "OK"})",
       listed(1, 3), listed(1, 2)},
      {R"("LocationIndicatorActive": true, "Status": {"State": "Enabled", "Health": "Warning"})",
       listed(20, 3), listed(20, 2)},
      {R"("LocationIndicatorActive": false, "Status": {"Health": "Critical"})", listed(21, 1),
       listed(21, 1)},
      {R"("IndicatorLED": "Lit", "Status": {"State": "Enabled", "Health": null})", listed(1, 2),
       listed(1, 2)},
      {R"("IndicatorLED": "Lit", "Status": {"State": "Enabled"})", listed(1, 2), listed(1, 2)},
      {R"("IndicatorLED": "Lit", "Status": null)", listed(1, 2), listed(1, 2)},
  };
  for (const ChassisRow& row : rows) {
    const RedfishChassis chassis = readRedfishChassis("{" + row.members + "}");
    EXPECT_EQ(lightOf(chassis, OnReport::Alternating), row.alternating) << row.members;
    EXPECT_EQ(lightOf(chassis, OnReport::Steady), row.steady) << row.members;
  }
}

TEST(RedfishChassisLight, AWrongValueGivesTheUnreadableLightAndSaysWhy) {
  const std::vector<std::pair<std::string, std::string>> rows = {
      {R"("IndicatorLED": "Purple")",
       R"(IndicatorLED is the string "Purple", not "Lit", "Blinking", "Off" or null)"},
      {R"("IndicatorLED": "lit")",
       R"(IndicatorLED is the string "lit", not "Lit", "Blinking", "Off" or null)"},
      {R"("IndicatorLED": 2)",
       R"(IndicatorLED is the number 2, not "Lit", "Blinking", "Off" or null)"},
      {R"("LocationIndicatorActive": "yes")",
       R"(LocationIndicatorActive is the string "yes", not true, false or null)"},
      {R"("LocationIndicatorActive": 1)",
       "LocationIndicatorActive is the number 1, not true, false or null"},
      {R"("LocationIndicatorActive": [true])",
       "LocationIndicatorActive is an array, not true, false or null"},
      {R"("LocationIndicatorActive": {"Value": true})",
       "LocationIndicatorActive is an object, not true, false or null"},
      // The newer property wins, also when its value is wrong.
      {R"("LocationIndicatorActive": "on", "IndicatorLED": "Lit")",
       R"(LocationIndicatorActive is the string "on", not true, false or null)"},
      {R"("LocationIndicatorActive": true, "Status": {"Health": "Bad"})",
       R"(Status.Health is the string "Bad", not "OK", "Warning", "Critical" or null)"},
      {R"("LocationIndicatorActive": true, "Status": {"Health": 5})",
       R"(Status.Health is the number 5, not "OK", "Warning", "Critical" or null)"},
      {R"("LocationIndicatorActive": true, "Status": "OK")",
       R"(Status is the string "OK", not an object)"},
      {R"("IndicatorLED": ")" + std::string(60, 'x') + "\"",
       R"(IndicatorLED is a string of 60 bytes, not "Lit", "Blinking", "Off" or null)"},
      {R"("IndicatorLED": "Off\u0007")",
       R"(IndicatorLED is the string "Off\x07", not "Lit", "Blinking", "Off" or null)"},
  };
  for (const auto& [members, problem] : rows) {
    EXPECT_EQ(lightOf(readRedfishChassis("{" + members + "}")), listed(21, kNoAlarmState, problem))
        << members;
  }
}

TEST(RedfishDriveLight, OnlyLocationIndicatorActiveCounts) {
  const std::vector<std::pair<std::string, Light>> rows = {
      {R"("LocationIndicatorActive": true)", listed(1, 3)},
      {R"("LocationIndicatorActive": false, "Status": {"Health": "Warning"})", listed(20, 1)},
      {R"("LocationIndicatorActive": null)", listed(0, kNoAlarmState)},
      {R"("IndicatorLED": "Lit")", kNoLight},
      {R"("IndicatorLED": "Purple")", kNoLight},
      {R"("LocationIndicatorActive": 0)",
       listed(21, kNoAlarmState,
              "LocationIndicatorActive is the number 0, not true, false or null")},
  };
  for (const auto& [members, light] : rows) {
    EXPECT_EQ(lightOf(readRedfishDrive("{" + members + "}")), light) << members;
  }
}

TEST(RedfishResourceNames, TextThatCanDescribeALightElseNothing) {
  const std::vector<std::pair<std::string, std::string>> rows = {
      {R"("Name": "Drive Bay 3")", "Drive Bay 3"},
      {R"("Name": "Lecteur \u00e9tag\u00e8re 2")", "Lecteur \xc3\xa9tag\xc3\xa8re 2"},
      {R"("Name": "")", ""},
      {R"("Name": "   ")", ""},
      {R"("Name": "Bay\n3")", ""},
      {R"("Name": 3)", ""},
      {R"("Name": null)", ""},
      {R"("Id": "3")", ""},
      {R"("Name": ")" + std::string(256, 'n') + "\"", std::string(256, 'n')},
      {R"("Name": ")" + std::string(257, 'n') + "\"", ""},
  };
  for (const auto& [members, name] : rows) {
    EXPECT_EQ(readRedfishDrive("{" + members + "}").name, name) << members;
    EXPECT_EQ(readRedfishChassis("{" + members + "}").name, name) << members;
  }
}

TEST(RedfishChassisLinks, DrivesAndStorageAsTheChassisLinksThem) {
  const RedfishChassis direct = readRedfishChassis(
      R"({"Links": {"Drives": [{"@odata.id": "/redfish/v1/Chassis/1/Drives/0"},
                               {"@odata.id": "/redfish/v1/Chassis/1/Drives/1"}],
                    "Storage": [{"@odata.id": "/redfish/v1/Systems/1/Storage/1"}]}})");
  EXPECT_TRUE(direct.drives.present);
  EXPECT_EQ(direct.drives.paths, (std::vector<std::string>{"/redfish/v1/Chassis/1/Drives/0",
                                                           "/redfish/v1/Chassis/1/Drives/1"}));
  EXPECT_EQ(direct.storage.paths, std::vector<std::string>{"/redfish/v1/Systems/1/Storage/1"});

  const RedfishChassis none = readRedfishChassis(R"({"Links": {"Drives": []}})");
  EXPECT_TRUE(none.drives.present);
  EXPECT_TRUE(none.drives.paths.empty());
  EXPECT_FALSE(none.storage.present);

  const RedfishChassis noLinks = readRedfishChassis(R"({"Name": "x"})");
  EXPECT_FALSE(noLinks.drives.present);
  EXPECT_FALSE(noLinks.storage.present);
}

TEST(RedfishChassisLinks, LinksThatCannotBeFollowedSayWhy) {
  const std::vector<std::pair<std::string, std::string>> rows = {
      {R"({"Links": {"Drives": "/redfish/v1/Chassis/1/Drives"}})",
       R"(Links.Drives is the string "/redfish/v1/Chassis/1/Drives", not a list of links)"},
      {R"({"Links": {"Drives": [{"@odata.id": "/redfish/v1/Chassis/1/Drives/0"}, 3]}})",
       R"(Links.Drives[1] is the number 3, not a link (an object with "@odata.id"))"},
      {R"({"Links": {"Drives": [{"Id": "0"}]}})", R"(Links.Drives[0] has no "@odata.id")"},
      {R"({"Links": {"Drives": [{"@odata.id": 7}]}})",
       "Links.Drives[0].@odata.id is the number 7, not a path"},
      {R"({"Links": {"Drives": [{"@odata.id": "https://elsewhere.test/redfish/v1/x"}]}})",
       R"(Links.Drives[0] links to the string "https://elsewhere.test/redfish/v1/x", which is not )"
       "a path of this service"},
      {R"({"Links": {"Drives": [{"@odata.id": "/etc/passwd"}]}})",
       R"(Links.Drives[0] links to the string "/etc/passwd", which is not a path of this service)"},
      {R"({"Links": "none"})", R"(Links is the string "none", not an object)"},
  };
  for (const auto& [body, problem] : rows) {
    const RedfishChassis chassis = readRedfishChassis(body);
    EXPECT_TRUE(chassis.drives.present) << body;
    EXPECT_TRUE(chassis.drives.paths.empty()) << body;
    EXPECT_EQ(chassis.drives.problem, problem) << body;
  }
  EXPECT_EQ(readRedfishChassis(R"({"Links": {"Storage": {"@odata.id": "/redfish/v1/S"}}})")
                .storage.problem,
            "Links.Storage is an object, not a list of links");
}

TEST(RedfishStorage, ItsDrives) {
  EXPECT_EQ(readRedfishStorage(
                R"({"Drives": [{"@odata.id": "/redfish/v1/Systems/1/Storage/1/Drives/0"}]})")
                .paths,
            std::vector<std::string>{"/redfish/v1/Systems/1/Storage/1/Drives/0"});
  EXPECT_FALSE(readRedfishStorage(R"({"Name": "RAID"})").present);
  EXPECT_EQ(readRedfishStorage(R"({"Drives": {}})").problem,
            "Drives is an object, not a list of links");
}

TEST(RedfishServiceRoot, TheLinkToTheChassisCollection) {
  EXPECT_EQ(readRedfishServiceRoot(R"({"Chassis": {"@odata.id": "/redfish/v1/Chassis"}})").chassis,
            "/redfish/v1/Chassis");
  EXPECT_FALSE(readRedfishServiceRoot(R"({"Systems": {"@odata.id": "/redfish/v1/Systems"}})")
                   .chassis.has_value());
  EXPECT_EQ(
      answerError(
          +[](const std::string& b) { readRedfishServiceRoot(b); },
          R"({"Chassis": "/redfish/v1/Chassis"})"),
      R"(Chassis is the string "/redfish/v1/Chassis", not a link (an object with "@odata.id"))");
  EXPECT_EQ(answerError(
                +[](const std::string& b) { readRedfishServiceRoot(b); },
                R"({"Chassis": {"@odata.id": "https://elsewhere.test/redfish/v1/Chassis"}})"),
            "Chassis links to a string of 41 bytes, which is not a path of this service");
}

TEST(RedfishCollection, MembersAndTheNextPage) {
  const auto page = readRedfishCollection(
      R"({"Members": [{"@odata.id": "/redfish/v1/Chassis/1"}, {"@odata.id": "/redfish/v1/Chassis/2"}],
          "Members@odata.count": 3,
          "Members@odata.nextLink": "/redfish/v1/Chassis?$skip=2"})");
  EXPECT_EQ(page.members,
            (std::vector<std::string>{"/redfish/v1/Chassis/1", "/redfish/v1/Chassis/2"}));
  EXPECT_EQ(page.next, "/redfish/v1/Chassis?$skip=2");
  const auto paged = readRedfishCollection(
      R"({"Members": [], "Members@odata.nextLink": "/redfish/v1/Chassis/Page2"})");
  EXPECT_TRUE(paged.members.empty());
  EXPECT_EQ(paged.next, "/redfish/v1/Chassis/Page2");
}

TEST(RedfishAnswers, RefusedWithWhatIsWrong) {
  const auto collection = +[](const std::string& body) { readRedfishCollection(body); };
  const auto chassis = +[](const std::string& body) { readRedfishChassis(body); };
  EXPECT_EQ(answerError(collection, R"({"Name": "Chassis Collection"})"), "it has no \"Members\"");
  EXPECT_EQ(answerError(collection, R"({"Members": {}})"),
            "Members is an object, not a list of links");
  EXPECT_EQ(answerError(collection, R"({"Members": [{"@odata.id": "/x"}]})"),
            R"(Members[0] links to the string "/x", which is not a path of this service)");
  EXPECT_EQ(answerError(collection, R"({"Members": [], "Members@odata.nextLink": 2})"),
            "Members@odata.nextLink is the number 2, not a path of this service");
  EXPECT_EQ(
      answerError(collection, R"({"Members": [], "Members@odata.nextLink": "/redfish/v1/C?a b"})"),
      R"(Members@odata.nextLink is the string "/redfish/v1/C?a b", not a path of this service)");
  EXPECT_EQ(answerError(chassis, ""), "the answer is empty");
  EXPECT_EQ(answerError(chassis, "[]"), "the answer is not a JSON object");
  EXPECT_EQ(answerError(chassis, "\"Chassis\""), "the answer is not a JSON object");
  for (const std::string& broken :
       {std::string(R"({"Name": "Rack", "LocationIndicator)"), std::string("<html>Not here</html>"),
        std::string("{,}"), std::string("{\"Name\": \"\xff\"}")}) {
    EXPECT_EQ(answerError(chassis, broken).rfind("the answer is not valid JSON: ", 0), 0u)
        << broken << ": " << answerError(chassis, broken);
  }
}

TEST(RedfishServicePaths, OnlyPathsBelowTheServiceRoot) {
  for (const char* path :
       {"/redfish/v1", "/redfish/v1/", "/redfish/v1/Chassis", "/redfish/v1/Chassis/1U/Drives/0",
        "/redfish/v1/Chassis/Blade%201", "/redfish/v1/Systems/1/Storage/RAID.Integrated.1-1",
        "/redfish/v1/Chassis/a:b@c!$&'()*+,;=~_"}) {
    EXPECT_TRUE(isRedfishServicePath(path)) << path;
  }
  for (const char* path :
       {"", "/", "/redfish", "/redfish/v2/Chassis", "/redfish/v10", "redfish/v1/Chassis",
        "https://bmc/redfish/v1/Chassis", "/redfish/v1/Chassis?$top=2", "/redfish/v1/Chassis#/x",
        "/redfish/v1/../../etc/passwd", "/redfish/v1/Chassis/..", "/redfish/v1/./Chassis",
        "/redfish/v1/Chassis/1 U", "/redfish/v1/Chassis/%2", "/redfish/v1/Chassis/%zz",
        "/redfish/v1/Chassis/\xc3\xa9", "/redfish/v1/Chassis\\1"}) {
    EXPECT_FALSE(isRedfishServicePath(path)) << path;
  }
  EXPECT_TRUE(isRedfishServicePath("/redfish/v1/" + std::string(1012, 'a')));
  EXPECT_FALSE(isRedfishServicePath("/redfish/v1/" + std::string(1013, 'a')));
}

}  // namespace
