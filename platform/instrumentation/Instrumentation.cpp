// The instrumentation cursor. It reads every node of its source once, when it is opened, and
// then only walks its own copy, so one CIM operation sees one consistent tree.
#include <exception>
#include <stdexcept>
#include <string>

#include "KestaInstrumentation.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/SourceList.h"
#include "instrumentation/SourceLog.h"

namespace Kesta {

namespace {

// Writes the one log line about an unusable source and throws the same text.
[[noreturn]] void reportUnusable(const std::string& text) {
  platform::logSourceProblem(text);
  throw std::runtime_error(text);
}

std::vector<platform::InstrumentationNode> readAll(const platform::InstrumentationSource& source,
                                                   const std::string& origin) {
  try {
    return source.readNodes();
  } catch (const std::exception& error) {
    // Any failure, SourceError or not (memory, a parser surprise), ends up as the one line and
    // the one exception the caller expects.
    reportUnusable(platform::describeSource(source.name(), origin) +
                   " cannot be read: " + error.what());
  }
}

}  // namespace

Instrumentation::Instrumentation() {
  platform::SourceSetting setting;
  try {
    setting = platform::configuredSource();
  } catch (const std::exception& error) {
    reportUnusable(std::string("Instrumentation configuration cannot be used: ") + error.what());
  }
  // A list, or auto, reads every source it can and logs the others; it does not fail.
  if (platform::isSourceList(setting.text)) {
    nodes_ = platform::readSourceList(setting, platform::SourceSystem{}, platform::discoveryRoots())
                 .nodes;
    return;
  }
  std::unique_ptr<platform::InstrumentationSource> source;
  try {
    source = platform::makeInstrumentationSource(setting.text);
  } catch (const std::exception& error) {
    reportUnusable(platform::describeSource(setting.text, setting.origin) +
                   " cannot be read: " + error.what());
  }
  nodes_ = readAll(*source, setting.origin);
}

Instrumentation::Instrumentation(std::unique_ptr<platform::InstrumentationSource> source) {
  if (source == nullptr) {
    reportUnusable("Instrumentation source missing: no source was given to the cursor");
  }
  nodes_ = readAll(*source, std::string());
}

Instrumentation::~Instrumentation() = default;

bool Instrumentation::selectNode(NodeLexicon::NodeType type) {
  typeSelected_ = true;
  selectedType_ = type;
  position_ = 0;
  skipUnselected();
  return position_ < nodes_.size();
}

Instrumentation::operator bool() const { return position_ < nodes_.size(); }

Instrumentation& Instrumentation::operator++() {
  if (position_ < nodes_.size()) {
    ++position_;
    skipUnselected();
  }
  return *this;
}

// The path is kept as its printable text, so the source's own form and the printable form are
// the same and convertPathToString has nothing to convert.
std::string Instrumentation::getPathToNode() {
  return position_ < nodes_.size() ? nodes_[position_].path : std::string();
}

std::string Instrumentation::convertPathToString(const std::string& path) { return path; }

std::string Instrumentation::getNodeDescription() {
  return position_ < nodes_.size() ? nodes_[position_].description : std::string();
}

unsigned int Instrumentation::getNodeStatus() {
  return position_ < nodes_.size() ? nodes_[position_].status : 0;
}

bool Instrumentation::getProperty(NodeLexicon::Properties property, unsigned int& value) {
  if (position_ >= nodes_.size()) {
    return false;
  }
  const std::optional<unsigned int> found = nodes_[position_].property(property);
  if (found) {
    value = *found;
  }
  return found.has_value();
}

void Instrumentation::skipUnselected() {
  while (typeSelected_ && position_ < nodes_.size() && nodes_[position_].type != selectedType_) {
    ++position_;
  }
}

}  // namespace Kesta
