// The "file:" source: the JSON snapshot, parsed strictly, read afresh by every cursor.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdint>
#include <iostream>
#include <memory>
#include <nlohmann/json.hpp>
#include <optional>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "FakeFileSystem.h"
#include "KestaInstrumentation.h"
#include "PlatformTestSupport.h"
#include "instrumentation/json/JsonFileSource.h"
#include "instrumentation/json/SnapshotDiagnosis.h"
#include "text/Text.h"

namespace {

using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::InstrumentationNode;
using Kesta::platform::JsonFileSource;
using Kesta::platform::parseNodeSnapshot;
using Kesta::platform::SourceError;
using platform_test::FakeFileSystem;
using platform_test::writeFileIn;
using testsupport::LogCapture;
using testsupport::ScopedEnv;
using testsupport::TempDir;

constexpr auto kBlueLight = NodeLexicon::NODE_TYPE_BLUE_LIGHT;
constexpr auto kAlarmState = NodeLexicon::PROPERTY_ALARM_STATE;
const std::string kFixtures = PLATFORM_TEST_FIXTURES;

// The same snapshot read the slow, obvious way through nlohmann's document model: an oracle for
// the streaming reader on valid input.
std::vector<InstrumentationNode> parseWithDocumentModel(const std::string& text) {
  const nlohmann::json document = nlohmann::json::parse(text);
  std::vector<InstrumentationNode> nodes;
  for (const nlohmann::json& entry : document.at("nodes")) {
    InstrumentationNode node;
    node.type = entry.at("type").get<unsigned int>();
    node.path = entry.at("path").get<std::string>();
    node.description = entry.at("description").get<std::string>();
    node.status = entry.value("status", 0u);
    if (entry.contains("properties")) {
      for (const auto& [key, value] : entry.at("properties").items()) {
        node.properties.push_back(
            {static_cast<unsigned int>(std::stoul(key)), value.get<unsigned int>()});
      }
    }
    nodes.push_back(std::move(node));
  }
  return nodes;
}

// Node properties in a canonical order, since the document model sorts object members.
std::vector<InstrumentationNode> sortedProperties(std::vector<InstrumentationNode> nodes) {
  for (InstrumentationNode& node : nodes) {
    std::sort(node.properties.begin(), node.properties.end(),
              [](const auto& a, const auto& b) { return a.number < b.number; });
  }
  return nodes;
}

std::string failureOf(const std::string& json) {
  try {
    parseNodeSnapshot(json);
  } catch (const SourceError& error) {
    return error.what();
  }
  return "(no failure)";
}

std::vector<std::string> bluePaths(Instrumentation& cursor) {
  std::vector<std::string> paths;
  for (cursor.selectNode(kBlueLight); cursor; ++cursor) {
    paths.push_back(cursor.convertPathToString(cursor.getPathToNode()));
  }
  return paths;
}

// Opens a cursor on KESTA_INSTRUMENTATION=file:<path>, expecting it to fail; returns the
// exception text and checks that exactly that text went to the log as the only line.
std::string expectUnreadable(const std::string& path) {
  LogCapture capture;
  ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + path);
  std::string what = "(no exception)";
  try {
    Instrumentation cursor;
  } catch (const std::exception& error) {
    what = error.what();
  }
  const std::vector<std::string> lines = platform_test::rawLines(capture);
  EXPECT_EQ(lines.size(), 1u);
  if (!lines.empty()) {
    EXPECT_EQ(lines.front(), "Kesta.Platform.Instrumentation\t6000\tLOG\t" + what);
  }
  return what;
}

std::string prefixFor(const std::string& path) {
  return "Instrumentation source \"file:" + path +
         "\" (from KESTA_INSTRUMENTATION) cannot be read: ";
}

TEST(JsonSource, ReadsAValidTreeInFileOrder) {
  const std::vector<InstrumentationNode> nodes =
      parseNodeSnapshot(testsupport::readFile(kFixtures + "/valid_tree.json"));
  ASSERT_EQ(nodes.size(), 6u);
  EXPECT_EQ(nodes[0].type, 3u);
  EXPECT_EQ(nodes[1].path, "1.2");
  EXPECT_EQ(nodes[1].description, "Blue Light");
  EXPECT_EQ(nodes[1].status, 1u);
  EXPECT_EQ(nodes[1].property(kAlarmState), 2u);
  EXPECT_EQ(nodes[2].status, 0u) << "status absent means 0";
  EXPECT_TRUE(nodes[2].properties.empty()) << "properties absent means none";
  EXPECT_EQ(nodes[4].property(2), 4294967295u);
  EXPECT_EQ(nodes[4].property(0), 0u);
  EXPECT_EQ(nodes[5].description, "Licht \xC3\xA4 \xC3\xBC \xF0\x9F\x92\xA1");
}

TEST(JsonSource, AgreesWithTheDocumentModel) {
  const std::string text = testsupport::readFile(kFixtures + "/valid_tree.json");
  EXPECT_EQ(sortedProperties(parseNodeSnapshot(text)),
            sortedProperties(parseWithDocumentModel(text)));
}

TEST(JsonSource, CursorSkipsOtherTypesAndKeepsOrder) {
  ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + kFixtures + "/valid_tree.json");
  Instrumentation cursor;
  EXPECT_EQ(bluePaths(cursor), (std::vector<std::string>{"1.2", "1.3", "1.10", "2.1"}));

  cursor.selectNode(kBlueLight);
  unsigned int value = 0;
  EXPECT_EQ(cursor.getNodeDescription(), "Blue Light");
  EXPECT_EQ(cursor.getNodeStatus(), 1u);
  ASSERT_TRUE(cursor.getProperty(kAlarmState, value));
  EXPECT_EQ(value, 2u);
  ++cursor;
  EXPECT_EQ(cursor.getNodeStatus(), 0u);
  EXPECT_FALSE(cursor.getProperty(kAlarmState, value));
  ++cursor;
  EXPECT_EQ(cursor.getNodeDescription(), "Front Panel Light");
  ASSERT_TRUE(cursor.getProperty(kAlarmState, value));
  EXPECT_EQ(value, 3u);
}

TEST(JsonSource, EmptyTree) {
  ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + kFixtures + "/empty_tree.json");
  Instrumentation cursor;
  EXPECT_FALSE(cursor.selectNode(kBlueLight));
}

TEST(JsonSource, EveryCursorReadsTheFileAfresh) {
  TempDir dir;
  const std::string path = dir.file("tree.json");
  writeFileIn(path, R"({"nodes": [{"type": 26, "path": "1", "description": "Blue Light"}]})");
  ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + path);
  Instrumentation first;
  writeFileIn(path, R"({"nodes": [{"type": 26, "path": "1", "description": "Blue Light"},
                                {"type": 26, "path": "2", "description": "Blue Light"}]})");
  Instrumentation second;
  EXPECT_EQ(bluePaths(first), (std::vector<std::string>{"1"}));
  EXPECT_EQ(bluePaths(second), (std::vector<std::string>{"1", "2"}));
}

TEST(JsonSource, AcceptsEdgeValues) {
  const auto nodes = parseNodeSnapshot(
      "\xEF\xBB\xBF"  // a byte order mark is tolerated
      R"({"nodes": [{"type": -0, "path": "", "description": "", "status": 4294967295,
                     "properties": {"4294967295": 4294967295, "0": 0}}]})");
  ASSERT_EQ(nodes.size(), 1u);
  EXPECT_EQ(nodes[0].type, 0u);
  EXPECT_EQ(nodes[0].status, 4294967295u);
  EXPECT_EQ(nodes[0].property(4294967295u), 4294967295u);
}

struct RejectCase {
  std::string json;
  std::string reason;
};

class JsonSourceRejects : public ::testing::TestWithParam<RejectCase> {};

TEST_P(JsonSourceRejects, WithAReasonThatNamesThePlace) {
  EXPECT_EQ(failureOf(GetParam().json), GetParam().reason) << GetParam().json;
}

const std::string kRange = " is not a whole number from 0 to 4294967295";
const std::string kNode = R"("type": 26, "path": "1.2", "description": "Blue Light")";

INSTANTIATE_TEST_SUITE_P(
    Table, JsonSourceRejects,
    ::testing::Values(
        RejectCase{"[]", "the top level is not an object"},
        RejectCase{R"("nodes")", "the top level is not an object"},
        RejectCase{"{}", R"(there is no "nodes" array)"},
        RejectCase{R"({"nodes": {}})", R"("nodes" is not an array)"},
        RejectCase{R"({"nodes": null})", R"("nodes" is not an array)"},
        RejectCase{R"({"nodes": [], "nodes": []})", R"("nodes" is given twice)"},
        RejectCase{R"({"nodes": [1]})", "nodes[0] is not an object"},
        RejectCase{R"({"nodes": [[]]})", "nodes[0] is not an object"},
        RejectCase{R"({"nodes": [{"path": "a", "description": "d"}]})",
                   R"(nodes[0] has no "type")"},
        RejectCase{R"({"nodes": [{"type": 26, "description": "d"}]})", R"(nodes[0] has no "path")"},
        RejectCase{R"({"nodes": [{"type": 26, "path": "a"}]})", R"(nodes[0] has no "description")"},
        RejectCase{R"({"nodes": [{"type": "26", "path": "a", "description": "d"}]})",
                   "nodes[0].type" + kRange},
        RejectCase{R"({"nodes": [{"type": -1, "path": "a", "description": "d"}]})",
                   "nodes[0].type" + kRange},
        RejectCase{R"({"nodes": [{"type": 4294967296, "path": "a", "description": "d"}]})",
                   "nodes[0].type" + kRange},
        RejectCase{
            R"({"nodes": [{"type": 18446744073709551616, "path": "a", "description": "d"}]})",
            "nodes[0].type" + kRange},
        RejectCase{R"({"nodes": [{"type": 26.0, "path": "a", "description": "d"}]})",
                   "nodes[0].type" + kRange},
        RejectCase{R"({"nodes": [{"type": 1e3, "path": "a", "description": "d"}]})",
                   "nodes[0].type" + kRange},
        RejectCase{R"({"nodes": [{"type": 26, "type": 26, "path": "a", "description": "d"}]})",
                   "nodes[0].type is given twice"},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "status": true}]})", "nodes[0].status" + kRange},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "status": null}]})", "nodes[0].status" + kRange},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "status": -20}]})", "nodes[0].status" + kRange},
        RejectCase{R"({"nodes": [{"type": 26, "path": 12, "description": "d"}]})",
                   "nodes[0].path is not a string"},
        RejectCase{R"({"nodes": [{"type": 26, "path": "a", "description": null}]})",
                   "nodes[0].description is not a string"},
        RejectCase{R"({"nodes": [{"type": 26, "path": "a\u0000b", "description": "d"}]})",
                   "nodes[0].path contains the character U+0000"},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": []}]})",
                   "nodes[0].properties is not an object"},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": {"x": 1}}]})",
                   R"(nodes[0].properties has the key "x", which is not a property number)"},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": {"-1": 1}}]})",
                   R"(nodes[0].properties has the key "-1", which is not a property number)"},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": {"01": 1}}]})",
                   R"(nodes[0].properties has the key "01", which is not a property number)"},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": {" 1": 1}}]})",
                   R"(nodes[0].properties has the key " 1", which is not a property number)"},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": {"": 1}}]})",
                   R"(nodes[0].properties has the key "", which is not a property number)"},
        RejectCase{
            "{\"nodes\": [{" + kNode + R"(, "properties": {"4294967296": 1}}]})",
            R"(nodes[0].properties has the key "4294967296", which is not a property number)"},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": {"1": -2}}]})",
                   "nodes[0].properties.1" + kRange},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": {"1": "2"}}]})",
                   "nodes[0].properties.1" + kRange},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": {"1": 4294967296}}]})",
                   "nodes[0].properties.1" + kRange},
        RejectCase{"{\"nodes\": [{" + kNode + R"(, "properties": {"1": 1, "1": 2}}]})",
                   "nodes[0].properties.1 is given twice"},
        RejectCase{"{\"nodes\": [{" + kNode + "}, {" + kNode + R"(, "status": 1.5}]})",
                   "nodes[1].status" + kRange}));

TEST(JsonSource, RejectsBrokenJsonWithItsPosition) {
  EXPECT_EQ(failureOf(R"({"nodes": [}})"),
            "it is not valid JSON: unexpected character '}' at line 1, column 12");
  EXPECT_EQ(failureOf("{\"nodes\": [\n  {\"type\": 26,\n   \"path\": \"a\" \"x\"}]}"),
            "it is not valid JSON: unexpected character '\"' at line 3, column 16");
  EXPECT_EQ(failureOf(""), "it is not valid JSON: unexpected end of text at line 1, column 1");
  EXPECT_EQ(failureOf("{\"nodes\": [], \"x\": \"abc"),
            "it is not valid JSON: unterminated string at line 1, column 24");
  EXPECT_EQ(failureOf("{\"nodes\": []} {}"),
            "it is not valid JSON: text after the top-level object at line 1, column 15");
  EXPECT_EQ(failureOf("{\"nodes\": [], \"x\": 01}"),
            "it is not valid JSON: unexpected character '1' at line 1, column 21");
}

TEST(JsonSource, RejectsWhatIsNotStrictJson) {
  for (const std::string& text :
       {std::string(""), std::string("{\"nodes\": []} x"), std::string("// c\n{\"nodes\": []}"),
        std::string("{\"nodes\": [],}"), std::string("{'nodes': []}")}) {
    EXPECT_EQ(failureOf(text).rfind("it is not valid JSON: ", 0), 0u) << text;
  }
}

TEST(JsonSource, RejectsInvalidUtf8WithoutPassingTheBytesOn) {
  for (const std::string text :
       {"{\"nodes\": [{\"type\": 26, \"path\": \"\xFF\", \"description\": \"d\"}]}",
        "{\"nodes\": [{\"type\": 26, \"path\": \"a\", \"description\": \"\xC0\xAF\"}]}",
        "{\"nodes\": [{\"type\": 26, \"path\": \"\\ud800\", \"description\": \"d\"}]}",
        "{\"no\xED\xA0\x80\": []}"}) {
    const std::string reason = failureOf(text);
    EXPECT_EQ(reason.rfind("it is not valid JSON: ", 0), 0u) << reason;
    EXPECT_TRUE(Kesta::platform::isValidUtf8(reason)) << reason;
    EXPECT_EQ(reason.find('\n'), std::string::npos);
  }
}

TEST(JsonSource, DeepNestingInIgnoredMembersIsFine) {
  const std::string deep = std::string(10000, '[') + std::string(10000, ']');
  const auto nodes = parseNodeSnapshot("{\"x\": " + deep + ", \"nodes\": [{" + kNode +
                                       ", \"extra\": " + deep + "}]}");
  EXPECT_EQ(nodes.size(), 1u);
}

TEST(JsonSource, MissingFileIsLoggedAndThrown) {
  TempDir dir;
  const std::string path = dir.file("absent.json");
  EXPECT_EQ(expectUnreadable(path), prefixFor(path) + "No such file or directory");
}

TEST(JsonSource, DirectoryInsteadOfFileIsLoggedAndThrown) {
  TempDir dir;
  EXPECT_EQ(expectUnreadable(dir.path()), prefixFor(dir.path()) + "it is a directory");
}

TEST(JsonSource, FifoInsteadOfFileIsLoggedAndThrownWithoutBlocking) {
  TempDir dir;
  const std::string path = dir.file("fifo");
  ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);
  EXPECT_EQ(expectUnreadable(path), prefixFor(path) + "it is not a regular file");
}

// What a cursor over `source` reports: the exception text, after checking that the same text is
// the one log line.
std::string expectUnreadableSource(std::unique_ptr<JsonFileSource> source) {
  LogCapture capture;
  std::string what = "(no exception)";
  try {
    Instrumentation cursor(std::move(source));
  } catch (const std::exception& error) {
    what = error.what();
  }
  EXPECT_EQ(platform_test::rawLines(capture),
            std::vector<std::string>{"Kesta.Platform.Instrumentation\t6000\tLOG\t" + what});
  return what;
}

TEST(JsonSource, UnreadableFileIsLoggedAndThrown) {
  TempDir dir;
  const std::string path = dir.file("secret.json");
  writeFileIn(path, "{\"nodes\": []}");
  ASSERT_EQ(::chmod(path.c_str(), 0), 0);
  // The kernel refuses a file of mode 0 to everyone but root; the refusal is injected, so that
  // the test means the same whoever runs it.
  const auto files = FakeFileSystem::overRealFiles();
  files->fail(FakeFileSystem::Call::Open, path, EACCES);
  EXPECT_EQ(expectUnreadableSource(std::make_unique<JsonFileSource>(path, files)),
            "Instrumentation source \"file:" + path + "\" cannot be read: Permission denied");
  EXPECT_EQ(files->count(FakeFileSystem::Call::Open, path), 1u);
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(JsonSource, AFileThatFailsWhileBeingReadIsLoggedAndThrown) {
  TempDir dir;
  const std::string path = dir.file("tree.json");
  writeFileIn(path, "{\"nodes\": []}");
  const auto files = FakeFileSystem::overRealFiles();
  files->fail(FakeFileSystem::Call::Read, path, EIO);
  EXPECT_EQ(expectUnreadableSource(std::make_unique<JsonFileSource>(path, files)),
            "Instrumentation source \"file:" + path + "\" cannot be read: Input/output error");
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(JsonSource, ASnapshotIsReadThroughTheGivenFileSystem) {
  const auto files = std::make_shared<FakeFileSystem>();
  files->addFile("/var/lib/kesta/tree.json",
                 "{\"nodes\": [{\"type\": 26, \"path\": \"1.2\", \"description\": \"Blue "
                 "Light\"}]}");
  const JsonFileSource source("/var/lib/kesta/tree.json", files);
  EXPECT_EQ(source.name(), "file:/var/lib/kesta/tree.json");
  const std::vector<InstrumentationNode> nodes = source.readNodes();
  ASSERT_EQ(nodes.size(), 1u);
  EXPECT_EQ(nodes[0].path, "1.2");
  // Afresh on every read.
  files->addFile("/var/lib/kesta/tree.json", "{\"nodes\": []}");
  EXPECT_TRUE(source.readNodes().empty());
}

TEST(JsonSource, MalformedFixtureIsLoggedAndThrown) {
  const std::string path = kFixtures + "/malformed.json";
  const std::string what = expectUnreadable(path);
  EXPECT_EQ(what, prefixFor(path) +
                      "it is not valid JSON: unexpected character '}' at line 1, column 68");
}

TEST(JsonSource, MissingFieldFixtureIsLoggedAndThrown) {
  const std::string path = kFixtures + "/missing_description.json";
  EXPECT_EQ(expectUnreadable(path), prefixFor(path) + R"(nodes[1] has no "description")");
}

TEST(JsonSource, OutOfRangeFixtureIsLoggedAndThrown) {
  const std::string path = kFixtures + "/out_of_range.json";
  EXPECT_EQ(expectUnreadable(path), prefixFor(path) + "nodes[0].properties.1" + kRange);
}

TEST(JsonSource, WrongTypeFixtureIsLoggedAndThrown) {
  const std::string path = kFixtures + "/wrong_type.json";
  EXPECT_EQ(expectUnreadable(path), prefixFor(path) + "nodes[0].type" + kRange);
}

TEST(JsonSource, NonUtf8FileIsLoggedAndThrown) {
  TempDir dir;
  const std::string path = dir.file("latin1.json");
  writeFileIn(path,
              "{\"nodes\": [{\"type\": 26, \"path\": \"1\", \"description\": \"Blaue "
              "Leuchte \xE4\"}]}");
  const std::string what = expectUnreadable(path);
  EXPECT_EQ(what.rfind(prefixFor(path) + "it is not valid JSON: ", 0), 0u) << what;
  EXPECT_TRUE(Kesta::platform::isValidUtf8(what));
}

TEST(JsonSource, PathWithLineBreakStaysOneLogLine) {
  TempDir dir;
  const std::string path = dir.file("two\nlines.json");
  const std::string what = expectUnreadable(path);
  EXPECT_EQ(what, "Instrumentation source \"file:" + dir.path() +
                      "/two\\x0Alines.json\" (from KESTA_INSTRUMENTATION) cannot be read: No "
                      "such file or directory");
}

// The snapshot rules applied to nlohmann's document: the nodes, or nothing when the document
// is valid JSON but not a valid snapshot. Repeated member names are invisible here (the document
// keeps one of them), so callers leave those cases out.
std::optional<std::vector<InstrumentationNode>> oracleNodes(const nlohmann::json& document) {
  const auto whole = [](const nlohmann::json& value) -> std::optional<unsigned int> {
    if (value.is_number_unsigned() && value.get<std::uint64_t>() <= 4294967295u) {
      return static_cast<unsigned int>(value.get<std::uint64_t>());
    }
    if (value.is_number_integer() && value.get<std::int64_t>() == 0) {
      return 0u;  // "-0"
    }
    return std::nullopt;
  };
  const auto text = [](const nlohmann::json& value) -> std::optional<std::string> {
    if (!value.is_string() || value.get<std::string>().find('\0') != std::string::npos) {
      return std::nullopt;
    }
    return value.get<std::string>();
  };
  if (!document.is_object() || !document.contains("nodes") || !document["nodes"].is_array()) {
    return std::nullopt;
  }
  std::vector<InstrumentationNode> nodes;
  for (const nlohmann::json& entry : document["nodes"]) {
    if (!entry.is_object() || !entry.contains("type") || !entry.contains("path") ||
        !entry.contains("description")) {
      return std::nullopt;
    }
    InstrumentationNode node;
    const auto type = whole(entry["type"]);
    const auto path = text(entry["path"]);
    const auto description = text(entry["description"]);
    if (!type || !path || !description) {
      return std::nullopt;
    }
    node.type = *type;
    node.path = *path;
    node.description = *description;
    if (entry.contains("status")) {
      const auto status = whole(entry["status"]);
      if (!status) {
        return std::nullopt;
      }
      node.status = *status;
    }
    if (entry.contains("properties")) {
      if (!entry["properties"].is_object()) {
        return std::nullopt;
      }
      for (const auto& [key, value] : entry["properties"].items()) {
        const bool canonical = !key.empty() && key.size() <= 10 &&
                               key.find_first_not_of("0123456789") == std::string::npos &&
                               (key.size() == 1 || key[0] != '0') &&
                               std::stoull(key) <= 4294967295u;
        const auto number = whole(value);
        if (!canonical || !number) {
          return std::nullopt;
        }
        node.properties.push_back({static_cast<unsigned int>(std::stoull(key)), *number});
      }
    }
    nodes.push_back(std::move(node));
  }
  return nodes;
}

// True when some object in `text` (valid JSON) names a member twice; the document model keeps
// only one of them, so it cannot judge such a text.
bool repeatsMemberNames(const std::string& text) {
  struct Sax {
    std::vector<std::set<std::string>> names;
    bool repeated = false;
    bool null() { return true; }
    bool boolean(bool) { return true; }
    bool number_integer(nlohmann::json::number_integer_t) { return true; }
    bool number_unsigned(nlohmann::json::number_unsigned_t) { return true; }
    bool number_float(nlohmann::json::number_float_t, const std::string&) { return true; }
    bool string(std::string&) { return true; }
    bool binary(nlohmann::json::binary_t&) { return true; }
    bool start_object(std::size_t) {
      names.emplace_back();
      return true;
    }
    bool key(std::string& name) {
      repeated = repeated || !names.back().insert(name).second;
      return true;
    }
    bool end_object() {
      names.pop_back();
      return true;
    }
    bool start_array(std::size_t) { return true; }
    bool end_array() { return true; }
    bool parse_error(std::size_t, const std::string&, const nlohmann::detail::exception&) {
      return false;
    }
  } sax;
  nlohmann::json::sax_parse(text, &sax);
  return sax.repeated;
}

// nlohmann's verdict on `text`. It refuses numbers too large for a double (error 406), which
// JSON itself allows; that verdict is told apart.
enum class Verdict { kValid, kInvalid, kNumberTooLarge };

Verdict nlohmannVerdict(const std::string& text) {
  try {
    const nlohmann::json document = nlohmann::json::parse(text);
    return document.is_discarded() ? Verdict::kInvalid : Verdict::kValid;
  } catch (const nlohmann::json::out_of_range& error) {
    return error.id == 406 ? Verdict::kNumberTooLarge : Verdict::kInvalid;
  } catch (const nlohmann::json::exception&) {
    return Verdict::kInvalid;
  }
}

// Damages `text` at random: bytes deleted, inserted, replaced, slices repeated or cut off.
std::string damage(std::string text, std::mt19937& random) {
  static const char kBytes[] = "{}[]\",:0123456789-+.eE tfnrul\\/u\n\t\x7F\xC3\xA4\xFF\xED\xA0";
  static const std::string kAlphabet = std::string(kBytes, sizeof kBytes - 1) + '\0';
  const int operations = 1 + static_cast<int>(random() % 4);
  for (int i = 0; i < operations && !text.empty(); ++i) {
    const std::size_t at = random() % text.size();
    switch (random() % 5) {
      case 0:
        text.erase(at, 1 + random() % 3);
        break;
      case 1:
        text.insert(at, 1, kAlphabet[random() % kAlphabet.size()]);
        break;
      case 2:
        text[at] = kAlphabet[random() % kAlphabet.size()];
        break;
      case 3:
        text.insert(at, text.substr(random() % text.size(), 1 + random() % 12));
        break;
      default:
        text.resize(at);
        break;
    }
  }
  return text;
}

TEST(JsonSource, AgreesWithNlohmannOnDamagedInput) {
  const std::vector<std::string> seeds = {
      testsupport::readFile(kFixtures + "/valid_tree.json"),
      R"({"nodes":[{"type":26,"path":"a\"\\\/\b\f\n\r\t\u00e4\ud83d\udca1","description":"d",)"
      R"("status":0,"properties":{"0":1,"10":4294967295}}],"x":[1.5e-3,-0,true,false,null,{}]})",
      R"({"nodes": [{"type": 26, "path": "1.2", "description": "Blue Light"}]})"};
  std::mt19937 random(4242);
  int accepted = 0;
  int syntaxRejected = 0;
  int shapeRejected = 0;
  for (int round = 0; round < 30000; ++round) {
    const std::string text = damage(seeds[round % seeds.size()], random);
    std::optional<std::vector<InstrumentationNode>> ours;
    std::string reason;
    try {
      ours = parseNodeSnapshot(text);
    } catch (const SourceError& error) {
      reason = error.what();
    }
    const bool ourSyntaxError = reason.rfind("it is not valid JSON: ", 0) == 0;
    // The reader refuses, the diagnosis explains: both must see the same texts as wrong, or a
    // refusal would go out without its reason.
    ASSERT_EQ(Kesta::platform::snapshotProblem(text), reason) << Kesta::platform::printable(text);
    if (text.find('\0') != std::string::npos) {
      // A raw NUL byte is never valid JSON; nlohmann takes it for the end of the input and
      // judges only what stands before it, so it is no oracle here.
      ASSERT_FALSE(ours.has_value()) << Kesta::platform::printable(text);
      ++syntaxRejected;
      continue;
    }
    const Verdict verdict = nlohmannVerdict(text);
    if (verdict == Verdict::kNumberTooLarge) {
      continue;
    }
    if (verdict == Verdict::kInvalid) {
      ASSERT_FALSE(ours.has_value())
          << "accepted what is not JSON: " << Kesta::platform::printable(text);
      ++syntaxRejected;
      continue;
    }
    ASSERT_FALSE(ourSyntaxError) << reason
                                 << " for valid JSON: " << Kesta::platform::printable(text);
    if (repeatsMemberNames(text)) {
      // Repeats among the snapshot's own members are refused; inside ignored members they are
      // nobody's business. Either way the document model cannot tell.
      continue;
    }
    const auto expected = oracleNodes(nlohmann::json::parse(text));
    ASSERT_EQ(ours.has_value(), expected.has_value())
        << reason << " for: " << Kesta::platform::printable(text);
    if (ours) {
      EXPECT_EQ(sortedProperties(*ours), sortedProperties(*expected)) << text;
      ++accepted;
    } else {
      ++shapeRejected;
    }
  }
  // The damage must reach all three outcomes, or the comparison proves little.
  EXPECT_GT(accepted, 100);
  EXPECT_GT(syntaxRejected, 1000);
  EXPECT_GT(shapeRejected, 100);
}

std::string largeTree(std::size_t count) {
  std::string text = "{\"nodes\": [\n";
  for (std::size_t i = 0; i < count; ++i) {
    const bool blue = i % 4 != 3;
    text += (i == 0 ? "" : ",\n");
    text +=
        "{\"type\": " + std::string(blue ? "26" : "7") + ", \"path\": \"1." + std::to_string(i) +
        "\", \"description\": \"Blue Light\", \"status\": " + std::to_string(i % 2 == 0 ? 1 : 20) +
        ", \"properties\": {\"1\": " + std::to_string(1 + i % 3) + "}}";
  }
  return text + "\n]}\n";
}

double millisecondsToOpen(const std::string& path, std::size_t& blueCount) {
  ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + path);
  constexpr int kRounds = 5;
  double best = 1e9;
  for (int round = 0; round < kRounds; ++round) {
    const auto start = std::chrono::steady_clock::now();
    Instrumentation cursor;
    const auto end = std::chrono::steady_clock::now();
    best = std::min(best, std::chrono::duration<double, std::milli>(end - start).count());
    blueCount = 0;
    for (cursor.selectNode(kBlueLight); cursor; ++cursor) {
      ++blueCount;
    }
  }
  return best;
}

TEST(JsonSource, LargeTrees) {
  TempDir dir;
  for (const std::size_t count : {std::size_t{4096}, std::size_t{65537}}) {
    const std::string path = dir.file("tree" + std::to_string(count) + ".json");
    const std::string text = largeTree(count);
    writeFileIn(path, text);

    const std::vector<InstrumentationNode> nodes = parseNodeSnapshot(text);
    ASSERT_EQ(nodes.size(), count);
    EXPECT_EQ(nodes.front().path, "1.0");
    EXPECT_EQ(nodes.back().path, "1." + std::to_string(count - 1));
    EXPECT_EQ(nodes, parseWithDocumentModel(text));

    std::size_t blue = 0;
    const double cursorMs = millisecondsToOpen(path, blue);
    EXPECT_EQ(blue, count - count / 4);

    const auto start = std::chrono::steady_clock::now();
    const auto viaDocument = parseWithDocumentModel(text);
    const double documentMs =
        std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count();
    std::cout << "[ timing ] " << count << " nodes (" << text.size() / 1024
              << " KiB): cursor opened in " << cursorMs << " ms (best of 5); document-model "
              << "parse of the same text " << documentMs << " ms\n";
    // Reported, not judged: a loaded machine or a sanitizer makes any bound on wall time fail
    // for reasons of its own. The benchmarks (scripts/bench.sh) hold an operation, the reading
    // of the tree included, to its targets.
    RecordProperty("nodes_" + std::to_string(count) + "_cursor_ms", std::to_string(cursorMs));
  }
}

}  // namespace
