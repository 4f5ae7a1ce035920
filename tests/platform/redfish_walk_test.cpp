// The walk of a Redfish service, against a session that answers from a table: the services of
// tests/redfish-mock/services, and answers the tests set for single paths. The table's clock moves
// only when a request is made, so the walk's deadline is met exactly, and nothing here touches a
// network.
#include <gtest/gtest.h>

#include <fstream>
#include <map>
#include <memory>
#include <nlohmann/json.hpp>
#include <optional>
#include <string>
#include <vector>

#include "ManualClock.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/redfish/RedfishWalk.h"

namespace {

using namespace std::chrono_literals;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::OnReport;
using Kesta::platform::RedfishAnswer;
using Kesta::platform::RedfishSession;
using Kesta::platform::RedfishWalkResult;
using Kesta::platform::RedfishWalkSettings;
using Kesta::platform::SourceError;
using Kesta::platform::walkRedfishService;
using platform_test::ManualClock;

const std::string kPrefix = "redfish:bmc:443";

// A service as a table of answers. Every request takes `perRequest` of the clock; one that would
// end after the deadline is not answered.
class TableSession final : public RedfishSession {
 public:
  explicit TableSession(const std::string& service) {
    std::ifstream in(std::string(REDFISH_TEST_SERVICES) + "/" + service + ".json");
    const nlohmann::json resources = nlohmann::json::parse(in);
    for (const auto& [path, resource] : resources.items()) {
      answers_[path] = RedfishAnswer::ok(resource.dump());
    }
  }

  void answer(const std::string& path, RedfishAnswer answer) { answers_[path] = std::move(answer); }
  void body(const std::string& path, const std::string& text) {
    answers_[path] = RedfishAnswer::ok(text);
  }

  RedfishAnswer get(const std::string& path, Kesta::platform::Clock::time_point deadline) override {
    requested.push_back(path);
    clock->advance(perRequest);
    if (clock->now() > deadline) {
      return RedfishAnswer::timedOut("no answer");
    }
    const auto found = answers_.find(path);
    if (found == answers_.end()) {
      return RedfishAnswer::refused("HTTP status 404 (Not Found)");
    }
    return found->second;
  }

  unsigned int connections() const override { return 1; }

  std::shared_ptr<ManualClock> clock = std::make_shared<ManualClock>();
  std::chrono::milliseconds perRequest{1};
  std::vector<std::string> requested;

 private:
  std::map<std::string, RedfishAnswer> answers_;
};

RedfishWalkSettings settings(bool drives = true, OnReport onReport = OnReport::Alternating) {
  RedfishWalkSettings walk;
  walk.pathPrefix = kPrefix;
  walk.drives = drives;
  walk.onReport = onReport;
  walk.timeout = 2000ms;
  return walk;
}

RedfishWalkResult walk(TableSession& session, const RedfishWalkSettings& walk = settings()) {
  return walkRedfishService(session, walk, session.clock->now() + walk.timeout);
}

std::string failure(TableSession& session) {
  try {
    walk(session);
  } catch (const SourceError& error) {
    return error.what();
  }
  return "(walked)";
}

InstrumentationNode light(const std::string& path, const std::string& description,
                          unsigned int status, std::optional<unsigned int> alarmState) {
  InstrumentationNode node;
  node.type = 26;
  node.path = kPrefix + path;
  node.description = description;
  node.status = status;
  if (alarmState) {
    node.properties.push_back({1, *alarmState});
  }
  return node;
}

std::vector<InstrumentationNode> rackServerLights() {
  const std::string drives = "/redfish/v1/Chassis/1U/Drives/";
  return {
      light("/redfish/v1/Chassis/1U", "Rack Server", 1, 1),
      light(drives + "0", "Drive Bay 0 in Rack Server", 1, 1),
      light(drives + "1", "Drive Bay 1 in Rack Server", 1, 3),
      light(drives + "2", "Drive Bay 2 in Rack Server", 20, 1),
      light(drives + "3", "Drive Bay 3 in Rack Server", 1, 1),
      light(drives + "4", "Drive Bay 4 in Rack Server", 21, 3),
      light(drives + "5", "Drive Bay 5 in Rack Server", 1, 1),
      light(drives + "6", "Drive Bay 6 in Rack Server", 1, 3),
      light(drives + "7", "/redfish/v1/Chassis/1U/Drives/7 in Rack Server", 1, 1),
  };
}

std::vector<std::string> rackServerRequests() {
  std::vector<std::string> paths = {"/redfish/v1/", "/redfish/v1/Chassis",
                                    "/redfish/v1/Chassis/1U"};
  for (int drive = 0; drive < 8; ++drive) {
    paths.push_back("/redfish/v1/Chassis/1U/Drives/" + std::to_string(drive));
  }
  return paths;
}

TEST(RedfishWalk, ARackServerIsOneChassisAndItsEightDrives) {
  TableSession session("rack-server");
  const RedfishWalkResult result = walk(session);
  EXPECT_EQ(result.nodes, rackServerLights());
  EXPECT_TRUE(result.problems.empty());
  // Exactly the service root and the links the answers gave; the Systems and Managers the
  // answers link are not for the walk.
  EXPECT_EQ(session.requested, rackServerRequests());
}

TEST(RedfishWalk, LightsThatAreOnAreSteadyWithOnSteady) {
  TableSession session("rack-server");
  const RedfishWalkResult result = walk(session, settings(true, OnReport::Steady));
  ASSERT_EQ(result.nodes.size(), 9u);
  EXPECT_EQ(result.nodes[2].property(1), 2u);
  EXPECT_EQ(result.nodes[1].property(1), 1u);
}

TEST(RedfishWalk, DrivesNoReadsTheChassisOnly) {
  TableSession session("rack-server");
  const RedfishWalkResult result = walk(session, settings(false));
  EXPECT_EQ(result.nodes, std::vector<InstrumentationNode>{rackServerLights().front()});
  EXPECT_EQ(session.requested, (std::vector<std::string>{"/redfish/v1/", "/redfish/v1/Chassis",
                                                         "/redfish/v1/Chassis/1U"}));
}

TEST(RedfishWalk, ABladeEnclosureReachesTheDrivesThroughTheStorageOfEachBlade) {
  TableSession session("blade-enclosure");
  const RedfishWalkResult result = walk(session);
  const auto drive = [](int blade, int number) {
    return "/redfish/v1/Systems/Blade" + std::to_string(blade) + "/Storage/1/Drives/" +
           std::to_string(number);
  };
  EXPECT_EQ(result.nodes, (std::vector<InstrumentationNode>{
                              light("/redfish/v1/Chassis/Enclosure", "Blade Enclosure", 1, 3),
                              light("/redfish/v1/Chassis/Blade1", "Blade 1", 1, 1),
                              light(drive(1, 0), "Drive 0 in Blade 1", 1, 3),
                              light(drive(1, 1), "Drive 1 in Blade 1", 1, 1),
                              light("/redfish/v1/Chassis/Blade2", "Blade 2", 1, 3),
                              light(drive(2, 0), "Drive 0 in Blade 2", 1, 1),
                              light(drive(2, 1), "Drive 1 in Blade 2", 1, 1),
                              light("/redfish/v1/Chassis/Blade3", "Blade 3", 20, 1),
                              light(drive(3, 0), "Drive 0 in Blade 3", 1, 1),
                              light(drive(3, 1), "Drive 1 in Blade 3", 1, 3),
                          }));
  EXPECT_TRUE(result.problems.empty());
  EXPECT_EQ(session.requested.size(), 2u + 1u + 3u * 4u);
}

TEST(RedfishWalk, AServiceWithIndicatorLedOnly) {
  TableSession session("indicator-led-only");
  const RedfishWalkResult result = walk(session);
  EXPECT_EQ(result.nodes, (std::vector<InstrumentationNode>{
                              light("/redfish/v1/Chassis/Front", "Front Panel", 1, 2),
                              light("/redfish/v1/Chassis/Rear", "Rear Panel", 1, 3),
                              light("/redfish/v1/Chassis/Tray", "Tray Panel", 1, 1),
                          }));
  EXPECT_TRUE(result.problems.empty());
  // The tray's drive was read; a drive's IndicatorLED gives no light.
  EXPECT_EQ(session.requested.back(), "/redfish/v1/Chassis/Tray/Drives/0");
}

TEST(RedfishWalk, AServiceWithNeitherPropertyHasNoLights) {
  TableSession session("no-indicators");
  const RedfishWalkResult result = walk(session);
  EXPECT_TRUE(result.nodes.empty());
  EXPECT_TRUE(result.problems.empty());
  EXPECT_EQ(session.requested.size(), 5u);
}

TEST(RedfishWalk, WrongValuesGiveUnreadableLightsAndOneLineEach) {
  TableSession session("wrong-types");
  const RedfishWalkResult result = walk(session);
  EXPECT_EQ(result.nodes, (std::vector<InstrumentationNode>{
                              light("/redfish/v1/Chassis/Purple", "Purple Light", 21, std::nullopt),
                              light("/redfish/v1/Chassis/Yes", "Yes Light", 21, std::nullopt),
                              light("/redfish/v1/Chassis/Sick", "Sick Light", 21, std::nullopt),
                              light("/redfish/v1/Chassis/Links", "Odd Links", 1, 1),
                              light("/redfish/v1/Chassis/Good", "Good Light", 1, 1),
                              light("/redfish/v1/Chassis/Good/Drives/0",
                                    "Numbered Drive in Good Light", 21, std::nullopt),
                          }));
  // Each problem is one sentence in adjacent literals, which the missing-comma check mistrusts.
  // NOLINTBEGIN(bugprone-suspicious-missing-comma)
  EXPECT_EQ(
      result.problems,
      (std::vector<std::string>{
          std::string("cannot read the identify light of /redfish/v1/Chassis/Purple: ") +
              "IndicatorLED is the string \"Purple\", not \"Lit\", \"Blinking\", \"Off\" or null",
          "cannot read the identify light of /redfish/v1/Chassis/Yes: LocationIndicatorActive is "
          "the string \"yes\", not true, false or null",
          "cannot read the identify light of /redfish/v1/Chassis/Sick: Status.Health is the string "
          "\"Bad\", not \"OK\", \"Warning\", \"Critical\" or null",
          "cannot follow the drives of the chassis /redfish/v1/Chassis/Links: Links.Drives is the "
          "string \"/redfish/v1/Chassis/Links/Drives\", not a list of links; their lights are left "
          "out",
          "cannot read the identify light of /redfish/v1/Chassis/Good/Drives/0: "
          "LocationIndicatorActive is the number 1, not true, false or null",
      }));
  // NOLINTEND(bugprone-suspicious-missing-comma)
}

TEST(RedfishWalk, AResourceThatCannotBeReadLeavesOutItsLightsAndSaysSo) {
  TableSession session("rack-server");
  session.answer("/redfish/v1/Chassis/1U/Drives/2",
                 RedfishAnswer::refused("HTTP status 404 (Not Found)"));
  session.body("/redfish/v1/Chassis/1U/Drives/5", R"({"Name": "Drive Bay 5", "LocationInd)");
  session.answer("/redfish/v1/Chassis/1U/Drives/6",
                 RedfishAnswer::refused("the answer is larger than 1024 KiB; it is not read"));
  const RedfishWalkResult result = walk(session);
  std::vector<InstrumentationNode> expected = rackServerLights();
  expected.erase(expected.begin() + 7);  // drive 6
  expected.erase(expected.begin() + 6);  // drive 5
  expected.erase(expected.begin() + 3);  // drive 2
  EXPECT_EQ(result.nodes, expected);
  ASSERT_EQ(result.problems.size(), 3u);
  EXPECT_EQ(result.problems[0],
            "cannot read the drive /redfish/v1/Chassis/1U/Drives/2: HTTP status 404 (Not Found); "
            "its light is left out");
  EXPECT_EQ(result.problems[1].rfind("cannot read the drive /redfish/v1/Chassis/1U/Drives/5: the "
                                     "answer is not valid JSON: ",
                                     0),
            0u)
      << result.problems[1];
  const std::string end = "; its light is left out";
  ASSERT_GT(result.problems[1].size(), end.size());
  EXPECT_EQ(result.problems[1].substr(result.problems[1].size() - end.size()), end);
  EXPECT_EQ(result.problems[2],
            "cannot read the drive /redfish/v1/Chassis/1U/Drives/6: the answer is larger than "
            "1024 KiB; it is not read; its light is left out");
}

TEST(RedfishWalk, AChassisThatCannotBeReadTakesItsDrivesWithIt) {
  TableSession session("blade-enclosure");
  session.answer("/redfish/v1/Chassis/Blade2",
                 RedfishAnswer::refused("HTTP status 500 (Internal Server Error)"));
  session.body("/redfish/v1/Systems/Blade3/Storage/1", "[]");
  const RedfishWalkResult result = walk(session);
  ASSERT_EQ(result.nodes.size(), 5u);
  EXPECT_EQ(result.nodes[3].path, kPrefix + "/redfish/v1/Systems/Blade1/Storage/1/Drives/1");
  EXPECT_EQ(result.nodes[4].path, kPrefix + "/redfish/v1/Chassis/Blade3");
  EXPECT_EQ(result.problems,
            (std::vector<std::string>{
                "cannot read the chassis /redfish/v1/Chassis/Blade2: HTTP status 500 (Internal "
                "Server Error); its lights are left out",
                "cannot read the storage resource /redfish/v1/Systems/Blade3/Storage/1: the answer "
                "is not a JSON object; the lights of its drives are left out",
            }));
}

TEST(RedfishWalk, TheServiceRootAndTheCollectionMustBeReadable) {
  {
    TableSession session("rack-server");
    session.answer("/redfish/v1/",
                   RedfishAnswer::lost("no connection to the service: Failed to connect to bmc"));
    EXPECT_EQ(failure(session),
              "GET /redfish/v1/: no connection to the service: Failed to connect to bmc");
  }
  {
    TableSession session("rack-server");
    session.answer("/redfish/v1/Chassis",
                   RedfishAnswer::refused("HTTP status 401 (Unauthorized): the service does not "
                                          "accept the account of the credentials file"));
    EXPECT_EQ(failure(session),
              "GET /redfish/v1/Chassis: HTTP status 401 (Unauthorized): the service does not "
              "accept the account of the credentials file");
  }
  {
    TableSession session("rack-server");
    session.body("/redfish/v1/", "<html>It works!</html>");
    EXPECT_EQ(failure(session).rfind("GET /redfish/v1/: the answer is not valid JSON: ", 0), 0u);
  }
  {
    TableSession session("rack-server");
    session.body("/redfish/v1/Chassis", R"({"Members": "all"})");
    EXPECT_EQ(failure(session),
              "GET /redfish/v1/Chassis: Members is the string \"all\", not a list of links");
  }
  {
    TableSession session("rack-server");
    session.perRequest = 3s;
    EXPECT_EQ(failure(session), "GET /redfish/v1/: no answer within 2000 ms");
  }
}

TEST(RedfishWalk, AServiceWithoutChassisHasNoLights) {
  TableSession session("rack-server");
  session.body("/redfish/v1/", R"({"Systems": {"@odata.id": "/redfish/v1/Systems"}})");
  const RedfishWalkResult result = walk(session);
  EXPECT_TRUE(result.nodes.empty());
  EXPECT_TRUE(result.problems.empty());
  EXPECT_EQ(session.requested, std::vector<std::string>{"/redfish/v1/"});
}

TEST(RedfishWalk, AtTheTimeoutTheLightsReadSoFarAreKeptAndOneLineSaysWhatIsLeftOut) {
  TableSession session("rack-server");
  session.perRequest = 100ms;
  RedfishWalkSettings walkSettings = settings();
  walkSettings.timeout = 650ms;
  // Six requests end within 650 ms: the root, the collection, the chassis, drives 0 to 2.
  const RedfishWalkResult result =
      walkRedfishService(session, walkSettings, session.clock->now() + walkSettings.timeout);
  std::vector<InstrumentationNode> expected = rackServerLights();
  expected.resize(4);
  EXPECT_EQ(result.nodes, expected);
  EXPECT_EQ(result.problems,
            std::vector<std::string>{
                "ran out of time: the walk took longer than 650 ms; "
                "/redfish/v1/Chassis/1U/Drives/3 and the 4 links after it were not read, and "
                "their lights are left out"});
  EXPECT_EQ(session.requested.size(), 7u) << "nothing is asked after the time is up";
}

TEST(RedfishWalk, ALostConnectionEndsTheWalkWithOneLine) {
  TableSession session("rack-server");
  session.answer("/redfish/v1/Chassis/1U/Drives/7",
                 RedfishAnswer::lost("Connection reset by peer"));
  const RedfishWalkResult result = walk(session);
  std::vector<InstrumentationNode> expected = rackServerLights();
  expected.pop_back();
  EXPECT_EQ(result.nodes, expected);
  EXPECT_EQ(result.problems,
            std::vector<std::string>{
                "lost the service at /redfish/v1/Chassis/1U/Drives/7: Connection reset by peer; "
                "/redfish/v1/Chassis/1U/Drives/7 was not read, and its lights are left out"});
}

TEST(RedfishWalk, EveryLinkIsReadOnceAndPagesAreFollowed) {
  TableSession session("rack-server");
  session.body("/redfish/v1/Chassis",
               R"({"Members": [{"@odata.id": "/redfish/v1/Chassis/1U"},
                               {"@odata.id": "/redfish/v1/Chassis/1U"}],
                   "Members@odata.nextLink": "/redfish/v1/Chassis?$skip=2"})");
  session.body("/redfish/v1/Chassis?$skip=2",
               R"({"Members": [{"@odata.id": "/redfish/v1/Chassis/Second"}],
                   "Members@odata.nextLink": "/redfish/v1/Chassis?$skip=2"})");
  // The second chassis links the first one's drive 0 again, and itself.
  session.body("/redfish/v1/Chassis/Second",
               R"({"Name": "Second", "LocationIndicatorActive": true,
                   "Links": {"Drives": [{"@odata.id": "/redfish/v1/Chassis/1U/Drives/0"},
                                        {"@odata.id": "/redfish/v1/Chassis/Second/Drives/9"},
                                        {"@odata.id": "/redfish/v1/Chassis/Second"}]}})");
  session.body("/redfish/v1/Chassis/Second/Drives/9",
               R"({"Name": "Spare", "LocationIndicatorActive": false})");
  const RedfishWalkResult result = walk(session);
  std::vector<InstrumentationNode> expected = rackServerLights();
  expected.push_back(light("/redfish/v1/Chassis/Second", "Second", 1, 3));
  expected.push_back(light("/redfish/v1/Chassis/Second/Drives/9", "Spare in Second", 1, 1));
  EXPECT_EQ(result.nodes, expected);
  EXPECT_TRUE(result.problems.empty());
  std::vector<std::string> requests = rackServerRequests();
  requests.insert(requests.end(), {"/redfish/v1/Chassis?$skip=2", "/redfish/v1/Chassis/Second",
                                   "/redfish/v1/Chassis/Second/Drives/9"});
  EXPECT_EQ(session.requested, requests);
}

}  // namespace
