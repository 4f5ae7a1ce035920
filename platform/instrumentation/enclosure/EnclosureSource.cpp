#include "instrumentation/enclosure/EnclosureSource.h"

#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <map>
#include <utility>

#include "KestaCommonBase.h"
#include "instrumentation/SourceLog.h"
#include "instrumentation/SourceOptions.h"
#include "os/FileIo.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

constexpr const char* kScheme = "enclosure:";

// An attribute is one page at most; the kernel reports 4096 as its size whatever it holds.
constexpr std::size_t kAttributeLimit = 4096;

// How much of an attribute's unexpected content a log line quotes: enough to recognise it, not
// a page of it.
constexpr std::size_t kQuotedBytes = 64;

// The entries of an enclosure's directory that are the device's own rather than components.
// They are told apart by name before anything is looked at, so the device's links (which may
// dangle) and its power directory cost nothing.
constexpr std::array<std::string_view, 6> kDeviceEntries = {"components", "device",    "id",
                                                            "power",      "subsystem", "uevent"};

bool isDigit(char c) { return c >= '0' && c <= '9'; }

bool isNumber(std::string_view text) {
  return !text.empty() && std::all_of(text.begin(), text.end(), isDigit);
}

// Two numbers by their value, however many digits they have: without leading zeros, the
// shorter is the smaller.
int compareNumbers(std::string_view first, std::string_view second) {
  const auto significant = [](std::string_view text) {
    const std::string_view::size_type start = text.find_first_not_of('0');
    return start == std::string_view::npos ? std::string_view() : text.substr(start);
  };
  first = significant(first);
  second = significant(second);
  if (first.size() != second.size()) {
    return first.size() < second.size() ? -1 : 1;
  }
  return first.compare(second);
}

// Why a name from the file system cannot become node text, or "" when it can. Node text goes
// into CIM strings and log lines as it is, so it must be UTF-8 without control characters.
std::string nameProblem(std::string_view name) {
  if (std::any_of(name.begin(), name.end(),
                  [](char c) { return static_cast<unsigned char>(c) < 0x20 || c == 0x7f; })) {
    return "its name holds control characters";
  }
  if (!isValidUtf8(name)) {
    return "its name is not UTF-8 text";
  }
  return std::string();
}

// Foreign content for a log line: printable, in quotes, cut short when long.
std::string quotedContent(std::string_view text) {
  if (text.size() <= kQuotedBytes) {
    return "\"" + printable(text) + "\"";
  }
  return "\"" + printable(text.substr(0, kQuotedBytes)) + "\"...";
}

void logFailure(const std::string& source, const std::string& what) {
  logSourceProblem(describeSource(source, "") + " " + what);
}

// One component with a locate light, before its light is read.
struct Component {
  std::string name;     // its directory name
  std::string slotKey;  // the `slot` attribute when it holds a number, else `name`
  std::string label;    // the slot label of the description
};

// Slot keys that are numbers first, by value; then the others by their text; components with
// the same key by name. (Comparing numbers by value and everything else by text, pair by pair,
// would not be an order: "2" < "10" < "ArrayDevice" < "2" by text.)
bool comesBefore(const Component& first, const Component& second) {
  const bool firstNumber = isNumber(first.slotKey);
  const bool secondNumber = isNumber(second.slotKey);
  if (firstNumber != secondNumber) {
    return firstNumber;
  }
  const int order = firstNumber ? compareNumbers(first.slotKey, second.slotKey)
                                : first.slotKey.compare(second.slotKey);
  if (order != 0) {
    return order < 0;
  }
  return first.name < second.name;
}

// The enclosure as the lights' names give it: its logical identifier, which stays with the
// hardware, or, when it has none that can be read, its directory name.
std::string enclosureIdentity(FileSystem& files, int enclosureFd, const std::string& name) {
  const ReadResult id = readRegularFile(files, enclosureFd, "id", kAttributeLimit);
  if (id.ok()) {
    std::string text = stripSpaces(id.data);
    if (!text.empty() && nameProblem(text).empty()) {
      return text;
    }
  }
  return name;
}

}  // namespace

EnclosureSourceSettings parseEnclosureSource(std::string_view rest) {
  const auto [directory, optionText] = splitAtQuestionMark(rest);
  std::map<std::string, std::string> options = parseOptionList(optionText);
  EnclosureSourceSettings settings;
  if (auto found = options.find("on"); found != options.end()) {
    settings.onReport = parseOnOption(found->second);
    options.erase(found);
  }
  refuseUnknownOptions(options, "on");
  if (!directory.empty()) {
    settings.directory = std::string(directory);
  }
  return settings;
}

IdentifyReading enclosureLocateReading(std::string_view text) {
  const std::string value = stripSpaces(std::string(text));
  if (value == "0") {
    return IdentifyReading::known(IdentifyState::Off);
  }
  if (value == "1") {
    return IdentifyReading::known(IdentifyState::IndefinitelyOn);
  }
  return IdentifyReading::unusable("it holds " + quotedContent(value) + ", not 0 or 1");
}

std::string EnclosureSource::name() const {
  return kScheme + directory_ + (onReport_ == OnReport::Steady ? "?on=steady" : "");
}

std::vector<InstrumentationNode> EnclosureSource::readNodes() const {
  const int opened = files_->openDirectory(kWorkingDirectory, directory_);
  if (opened < 0) {
    throw SourceError(errorText(-opened));
  }
  const FileSystemFd directory(*files_, opened);
  std::vector<std::string> names;
  if (const int listed = files_->listDirectory(directory.get(), names); listed < 0) {
    throw SourceError(errorText(-listed));
  }
  std::sort(names.begin(), names.end());

  std::vector<InstrumentationNode> nodes;
  for (const std::string& entry : names) {
    if (!entry.empty() && entry.front() != '.') {
      readEnclosure(directory.get(), entry, nodes);
    }
  }
  return nodes;
}

void EnclosureSource::readEnclosure(int classFd, const std::string& directoryName,
                                    std::vector<InstrumentationNode>& nodes) const {
  // The class directory holds symbolic links to the enclosures' directories; opening follows
  // them. Anything that is not a directory, a link that dangles and an enclosure that went away
  // since the listing are no enclosures.
  const int opened = files_->openDirectory(classFd, directoryName);
  if (opened == -ENOENT || opened == -ENOTDIR) {
    return;
  }
  if (opened < 0) {
    logFailure(name(),
               "cannot list enclosure \"" + printable(directoryName) + "\": " + errorText(-opened));
    return;
  }
  const FileSystemFd enclosure(*files_, opened);
  const int enclosureFd = enclosure.get();
  if (const std::string problem = nameProblem(directoryName); !problem.empty()) {
    logFailure(name(), "skips enclosure \"" + printable(directoryName) + "\": " + problem);
    return;
  }
  std::vector<std::string> entries;
  if (const int listed = files_->listDirectory(enclosureFd, entries); listed < 0) {
    logFailure(name(),
               "cannot list enclosure \"" + printable(directoryName) + "\": " + errorText(-listed));
    return;
  }
  std::sort(entries.begin(), entries.end());
  const std::string identity = enclosureIdentity(*files_, enclosureFd, directoryName);

  std::vector<Component> components;
  for (std::string& entry : entries) {
    if (std::find(kDeviceEntries.begin(), kDeviceEntries.end(), entry) != kDeviceEntries.end()) {
      continue;
    }
    // The stat follows the component's link, if it is one, and tells a component without a
    // locate light (or an entry that is no directory) from one whose light cannot be read,
    // which is still listed.
    struct stat info = {};
    const int found = files_->statAt(enclosureFd, entry + "/locate", info);
    if (found == -ENOENT || found == -ENOTDIR) {
      continue;
    }
    if (const std::string problem = nameProblem(entry); !problem.empty()) {
      logFailure(name(), "skips component \"" + printable(entry) + "\" of enclosure \"" +
                             printable(identity) + "\": " + problem);
      continue;
    }
    const ReadResult slot = readRegularFile(*files_, enclosureFd, entry + "/slot", kAttributeLimit);
    std::string slotNumber = slot.ok() ? stripSpaces(slot.data) : std::string();
    if (!isNumber(slotNumber)) {
      slotNumber.clear();
    }
    Component component;
    component.slotKey = slotNumber.empty() ? entry : slotNumber;
    component.label = isNumber(entry) ? "Slot " + (slotNumber.empty() ? entry : slotNumber) : entry;
    component.name = std::move(entry);
    components.push_back(std::move(component));
  }
  std::sort(components.begin(), components.end(), comesBefore);

  // The lights are read in their order, so that the log lines come in it too.
  for (const Component& component : components) {
    const std::string description = component.label + " locate light, enclosure " + identity;
    const ReadResult locate =
        readRegularFile(*files_, enclosureFd, component.name + "/locate", kAttributeLimit);
    const IdentifyReading reading = locate.ok() ? enclosureLocateReading(locate.data)
                                                : IdentifyReading::unusable(locate.reason);
    if (reading.kind == IdentifyReading::Kind::Unusable) {
      logFailure(name(), "cannot read the locate light of \"" + printable(description) +
                             "\": " + reading.problem);
    }
    nodes.push_back(identifyNode(reading, "enclosure/" + identity + "/" + component.slotKey,
                                 description, onReport_));
  }
}

std::unique_ptr<EnclosureSource> makeEnclosureSource(std::string_view rest,
                                                     std::shared_ptr<FileSystem> files) {
  EnclosureSourceSettings settings = parseEnclosureSource(rest);
  return std::make_unique<EnclosureSource>(std::move(settings.directory), std::move(files),
                                           settings.onReport);
}

}  // namespace platform
}  // namespace Kesta
