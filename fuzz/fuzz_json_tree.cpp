// Fuzz target: the JSON tree file of the "file:" instrumentation source.
//
// The input is written as the tree file and read the way an operation reads it: a cursor over a
// JsonFileSource, walked first over every node and then over the blue lights only, with every
// getter the collector calls, and finally by the collector itself (setVector). What the cursor
// saw must be exactly what parseNodeSnapshot makes of the same text, and a text that the parser
// refuses must make the cursor refuse it too. The parser's reader and its diagnosis of refused
// texts must agree: a refused text has a reason, an accepted one has none.
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "BlueLight.h"
#include "KestaCommonBase.h"
#include "KestaInstrumentation.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/json/JsonFileSource.h"
#include "instrumentation/json/SnapshotDiagnosis.h"

namespace {

std::string treeFile;

[[noreturn]] void fail(const char* what) {
  std::fprintf(stderr, "fuzz_json_tree: %s\n", what);
  std::abort();
}

void writeTreeFile(const std::uint8_t* data, std::size_t size) {
  std::FILE* file = std::fopen(treeFile.c_str(), "wb");
  if (file == nullptr) fail("cannot write the tree file");
  if (size != 0 && std::fwrite(data, 1, size, file) != size) fail("short write of the tree file");
  if (std::fclose(file) != 0) fail("cannot close the tree file");
}

// One node as the cursor shows it, read through the getters alone.
Kesta::platform::InstrumentationNode readCurrent(
    Kesta::Instrumentation& cursor, const Kesta::platform::InstrumentationNode& known) {
  Kesta::platform::InstrumentationNode seen;
  seen.type = known.type;  // the cursor has no getter for the type
  seen.path = cursor.convertPathToString(cursor.getPathToNode());
  seen.description = cursor.getNodeDescription();
  seen.status = cursor.getNodeStatus();
  for (const Kesta::platform::NodeProperty& property : known.properties) {
    unsigned int value = 0;
    if (!cursor.getProperty(static_cast<Kesta::NodeLexicon::Properties>(property.number), value)) {
      fail("the cursor lost a property of the node");
    }
    seen.properties.push_back({property.number, value});
  }
  return seen;
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  // The failure line of an unreadable tree goes through the logger; keep it off the system log
  // but let it format every line.
  setenv("VNLOG_SINK", "file:/dev/null", 1);
  setenv("VNLOG_LEVEL", "0", 1);
  const char* dir = std::getenv("TMPDIR");
  treeFile = std::string(dir != nullptr && *dir != '\0' ? dir : "/tmp") + "/fuzz_json_tree." +
             std::to_string(getpid()) + ".json";
  std::atexit([] { std::remove(treeFile.c_str()); });
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  writeTreeFile(data, size);
  const std::string_view text(reinterpret_cast<const char*>(data), size);

  std::vector<Kesta::platform::InstrumentationNode> parsed;
  bool parses = true;
  std::string reason;
  try {
    parsed = Kesta::platform::parseNodeSnapshot(text);
  } catch (const Kesta::platform::SourceError& error) {
    parses = false;
    reason = error.what();
  }
  if (Kesta::platform::snapshotProblem(text) != reason) {
    fail(parses ? "the diagnosis finds a problem in a tree that the reader accepts"
                : "the reader refused a tree without the diagnosis' reason");
  }

  std::unique_ptr<Kesta::Instrumentation> cursor;
  try {
    cursor = std::make_unique<Kesta::Instrumentation>(
        std::make_unique<Kesta::platform::JsonFileSource>(treeFile));
  } catch (const std::exception&) {
    if (parses) fail("the cursor refused a tree that the parser accepts");
    return 0;
  }
  if (!parses) fail("the cursor accepted a tree that the parser refuses");

  // Every node, in order, before a type is selected.
  std::size_t index = 0;
  for (; *cursor; ++*cursor, ++index) {
    if (index >= parsed.size()) fail("the cursor shows more nodes than the tree has");
    if (!(readCurrent(*cursor, parsed[index]) == parsed[index])) {
      fail("the cursor shows a node other than the parsed one");
    }
  }
  if (index != parsed.size()) fail("the cursor shows fewer nodes than the tree has");

  // The blue lights only, as the collector walks them.
  std::vector<const Kesta::platform::InstrumentationNode*> lights;
  for (const Kesta::platform::InstrumentationNode& node : parsed) {
    if (node.type == Kesta::NodeLexicon::NODE_TYPE_BLUE_LIGHT) lights.push_back(&node);
  }
  const bool any = cursor->selectNode(Kesta::NodeLexicon::NODE_TYPE_BLUE_LIGHT);
  if (any != !lights.empty()) fail("selectNode disagrees with the tree");
  index = 0;
  for (; *cursor; ++*cursor, ++index) {
    if (index >= lights.size()) fail("the cursor shows more lights than the tree has");
    if (!(readCurrent(*cursor, *lights[index]) == *lights[index])) {
      fail("the cursor shows a light other than the parsed one");
    }
  }
  if (index != lights.size()) fail("the cursor shows fewer lights than the tree has");
  // Past the end the getters answer "nothing" and stepping stays put.
  ++*cursor;
  unsigned int value = 0;
  if (*cursor || !cursor->getPathToNode().empty() || cursor->getNodeStatus() != 0 ||
      cursor->getProperty(Kesta::NodeLexicon::PROPERTY_ALARM_STATE, value)) {
    fail("the cursor shows a node past the end");
  }

  // The collector over the same lights: it may refuse a light it cannot record (it throws, and
  // the operation reports the tree as unusable), but every light it records is one of the tree.
  cursor->selectNode(Kesta::NodeLexicon::NODE_TYPE_BLUE_LIGHT);
  std::vector<Kesta::BlueLightProvider::BlueLight> recorded;
  try {
    Kesta::BlueLightProvider::setVector(recorded, *cursor);
  } catch (const std::exception&) {
  }
  if (recorded.size() > lights.size()) fail("the collector recorded more lights than there are");
  for (std::size_t i = 0; i < recorded.size(); ++i) {
    // The record keeps the text as it came and strips surrounding blanks when it is read.
    if (recorded[i].getDeviceID() !=
        Kesta::stripSpaces(lights[i]->description + ":" + lights[i]->path)) {
      fail("the collector recorded a DeviceID other than description:path");
    }
  }
  return 0;
}
