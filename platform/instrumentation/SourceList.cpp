#include "instrumentation/SourceList.h"

#include <sys/stat.h>

#include <cstdlib>
#include <exception>
#include <map>
#include <memory>
#include <set>
#include <utility>

#include "KestaCommonBase.h"
#include "KestaInstrumentation.h"
#include "instrumentation/SourceLog.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

// How many places a note lists before it says "and N more": the line must stay readable, and the
// logger cuts lines at 511 characters anyway.
constexpr std::size_t kMostNamedInNote = 5;

bool isAuto(std::string_view text) { return equalsIgnoringCase(text, kAutoSourceText); }

std::string quotedList(const std::vector<std::string>& items) {
  std::string text;
  for (std::size_t i = 0; i < items.size() && i < kMostNamedInNote; ++i) {
    text += (i == 0 ? "" : ", ") + items[i];
  }
  if (items.size() > kMostNamedInNote) {
    text += " and " + std::to_string(items.size() - kMostNamedInNote) + " more";
  }
  return text;
}

std::string plural(std::size_t count, const char* one, const char* many) {
  return std::to_string(count) + " " + (count == 1 ? one : many);
}

// A source of one kind that auto looks for: the text it reads it with, or why it is absent.
struct AutoCandidate {
  std::string text;
  bool found = false;
  std::string absent;
};

bool exists(FileSystem& files, const std::string& path) {
  struct stat info = {};
  return files.statAt(kWorkingDirectory, path, info) == 0;
}

bool isDirectory(FileSystem& files, const std::string& path) {
  struct stat info = {};
  return files.statAt(kWorkingDirectory, path, info) == 0 && S_ISDIR(info.st_mode);
}

std::vector<AutoCandidate> autoCandidates(FileSystem& files, const DiscoveryRoots& roots) {
  std::vector<AutoCandidate> candidates;

  AutoCandidate bmc;
  for (const std::string& device : roots.ipmiDevices) {
    if (exists(files, device)) {
      bmc = {"ipmi:" + device, true, {}};
      break;
    }
  }
  if (!bmc.found) {
    std::vector<std::string> looked;
    for (const std::string& device : roots.ipmiDevices) looked.push_back(printable(device));
    bmc = {"ipmi:", false, "no IPMI device (looked for " + quotedList(looked) + ")"};
  }
  candidates.push_back(std::move(bmc));

  if (isDirectory(files, roots.enclosures)) {
    candidates.push_back({"enclosure:" + roots.enclosures, true, {}});
  } else {
    candidates.push_back({"enclosure:", false, "no " + printable(roots.enclosures)});
  }

  if (isDirectory(files, roots.leds)) {
    candidates.push_back({"sysfs:" + roots.leds + "?lights=identify", true, {}});
  } else {
    candidates.push_back({"sysfs:?lights=identify", false, "no " + printable(roots.leds)});
  }
  return candidates;
}

// One walk of a list: the sources in order, each read once, each failure logged once.
class ListWalk {
 public:
  ListWalk(const SourceSetting& setting, const SourceSystem& system)
      : setting_(setting), system_(system) {}

  void readEntry(const std::string& text, const std::string& listedAs, const std::string& origin) {
    SourceOutcome outcome;
    outcome.text = text;
    outcome.listedAs = listedAs;
    std::unique_ptr<InstrumentationSource> source;
    try {
      source = makeInstrumentationSource(text, system_);
    } catch (const std::exception& error) {
      fail(outcome, origin, error.what());
      return;
    }
    // Two entries that name the same source ("sysfs:" and "sysfs:/sys/class/leds", or one that
    // auto found too) would give its lights twice.
    const std::string name = source->name();
    if (const auto earlier = names_.find(name); earlier != names_.end()) {
      outcome.state = SourceOutcome::State::Repeated;
      outcome.why = "the same source as \"" + printable(earlier->second) + "\"; read once";
      logSourceProblem(describeSource(text, origin) + " is the same source as \"" +
                       printable(earlier->second) + "\"; it is read once");
      reading_.outcomes.push_back(std::move(outcome));
      return;
    }
    names_.emplace(name, text);
    std::vector<InstrumentationNode> nodes;
    try {
      nodes = source->readNodes();
    } catch (const std::exception& error) {
      fail(outcome, origin, error.what());
      return;
    }
    outcome.state = SourceOutcome::State::Read;
    for (const InstrumentationNode& node : nodes) {
      if (node.type == NodeLexicon::NODE_TYPE_BLUE_LIGHT) ++outcome.lights;
    }
    if (outcome.lights == 0) outcome.why = "no light";
    reading_.nodes.insert(reading_.nodes.end(), std::make_move_iterator(nodes.begin()),
                          std::make_move_iterator(nodes.end()));
    reading_.outcomes.push_back(std::move(outcome));
  }

  void readAuto(const DiscoveryRoots& roots) {
    const std::string origin = "auto, " + setting_.origin;
    for (AutoCandidate& candidate : autoCandidates(*system_.files, roots)) {
      if (!candidate.found) {
        SourceOutcome outcome;
        outcome.text = std::move(candidate.text);
        outcome.listedAs = kAutoSourceText;
        outcome.why = std::move(candidate.absent);
        reading_.outcomes.push_back(std::move(outcome));
        continue;
      }
      readEntry(candidate.text, kAutoSourceText, origin);
    }
  }

  void note(const std::string& text) {
    reading_.notes.push_back(text);
    logSourceProblem("Instrumentation source list (from " + printable(setting_.origin) + ") " +
                     text);
  }

  SourceListReading finish() {
    keepDeviceIdsApart(reading_.nodes);
    return std::move(reading_);
  }

 private:
  void fail(SourceOutcome& outcome, const std::string& origin, const std::string& why) {
    outcome.state = SourceOutcome::State::Unreadable;
    outcome.why = why;
    logSourceProblem(describeSource(outcome.text, origin) + " cannot be read: " + why);
    reading_.outcomes.push_back(std::move(outcome));
  }

  const SourceSetting& setting_;
  const SourceSystem& system_;
  std::map<std::string, std::string> names_;  // source name -> the text that named it first
  SourceListReading reading_;
};

}  // namespace

const char* toString(SourceOutcome::State state) {
  switch (state) {
    case SourceOutcome::State::Absent:
      return "absent";
    case SourceOutcome::State::Unreadable:
      return "unreadable";
    case SourceOutcome::State::Repeated:
      return "repeated";
    case SourceOutcome::State::Read:
      return "read";
  }
  return "?";
}

bool isSourceList(std::string_view text) {
  return isAuto(text) || text.find(';') != std::string_view::npos;
}

ParsedSourceList parseSourceList(std::string_view text) {
  ParsedSourceList parsed;
  std::vector<std::string> empty;
  std::vector<std::string> repeated;
  std::set<std::string> seen;
  std::size_t kept = 0;
  std::size_t position = 0;
  for (;;) {
    ++position;
    const std::string_view::size_type end = text.find(';');
    std::string entry = stripSpaces(std::string(text.substr(0, end)));
    if (entry.empty()) {
      empty.push_back(std::to_string(position));
    } else if (!seen.insert(entry).second) {
      repeated.push_back("\"" + printable(entry) + "\"");
    } else {
      ++kept;
      if (parsed.entries.size() < kMostListedSources) parsed.entries.push_back(std::move(entry));
    }
    if (end == std::string_view::npos) break;
    text.remove_prefix(end + 1);
  }
  if (!empty.empty()) {
    parsed.notes.push_back("has " + plural(empty.size(), "empty entry", "empty entries") + " (" +
                           (empty.size() == 1 ? "entry " : "entries ") + quotedList(empty) +
                           "); left out");
  }
  if (!repeated.empty()) {
    parsed.notes.push_back("repeats " + plural(repeated.size(), "entry", "entries") + " (" +
                           quotedList(repeated) + "); each source is read once");
  }
  if (kept > kMostListedSources) {
    parsed.notes.push_back("names " + std::to_string(kept) + " sources; only the first " +
                           std::to_string(kMostListedSources) + " are read");
  }
  return parsed;
}

DiscoveryRoots discoveryRoots() {
  DiscoveryRoots roots;
  const char* variable = std::getenv("KESTA_DISCOVERY_ROOT");
  const std::string root = variable != nullptr ? stripSpaces(variable) : std::string();
  if (root.empty()) return roots;
  for (std::string& device : roots.ipmiDevices) device.insert(0, root);
  roots.enclosures = root + roots.enclosures;
  roots.leds = root + roots.leds;
  return roots;
}

SourceListReading readSourceList(const SourceSetting& setting, const SourceSystem& system,
                                 const DiscoveryRoots& roots) {
  ListWalk walk(setting, system);
  const ParsedSourceList parsed = parseSourceList(setting.text);
  for (const std::string& note : parsed.notes) walk.note(note);
  for (const std::string& entry : parsed.entries) {
    if (isAuto(entry)) {
      walk.readAuto(roots);
    } else {
      walk.readEntry(entry, entry, setting.origin);
    }
  }
  return walk.finish();
}

void keepDeviceIdsApart(std::vector<InstrumentationNode>& nodes) {
  std::set<std::string> given;
  for (InstrumentationNode& node : nodes) {
    if (node.type != NodeLexicon::NODE_TYPE_BLUE_LIGHT) continue;
    // The ID as the module makes it: "<description>:<path>" without surrounding blanks.
    if (given.insert(stripSpaces(node.description + ":" + node.path)).second) continue;
    for (unsigned long count = 2;; ++count) {
      std::string path = node.path + " #" + std::to_string(count);
      if (given.insert(stripSpaces(node.description + ":" + path)).second) {
        node.path = std::move(path);
        break;
      }
    }
  }
}

}  // namespace platform
}  // namespace Kesta
