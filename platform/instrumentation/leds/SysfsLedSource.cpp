#include "instrumentation/leds/SysfsLedSource.h"

#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <map>
#include <memory>

#include "KestaCommonBase.h"
#include "KestaInstrumentation.h"
#include "instrumentation/SourceOptions.h"
#include "os/FileIo.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

// Attribute files are one page; trigger lists may be longer on kernels with many triggers.
constexpr std::size_t kAttributeLimit = std::size_t{64} * 1024;

constexpr std::array<std::string_view, 5> kIdentificationWords = {"identify", "identification",
                                                                  "locate", "locator", "uid"};
constexpr std::array<std::string_view, 4> kBlinkingTriggers = {"timer", "heartbeat", "pattern",
                                                               "activity"};

constexpr unsigned int kAlarmOff = 1;
constexpr unsigned int kAlarmSteady = 2;
constexpr unsigned int kAlarmAlternating = 3;
constexpr unsigned int kStatusReadable = 1;

bool contains(const std::array<std::string_view, 5>& words, std::string_view word) {
  return std::find(words.begin(), words.end(), word) != words.end();
}

// The active trigger in the text of a trigger file: "none [timer] heartbeat" -> "timer". A file
// that marks none is taken as "none".
std::string activeTrigger(std::string_view text) {
  const std::string_view::size_type open = text.find('[');
  if (open == std::string_view::npos) {
    return "none";
  }
  const std::string_view::size_type close = text.find(']', open + 1);
  if (close == std::string_view::npos) {
    return "none";
  }
  return stripSpaces(std::string(text.substr(open + 1, close - open - 1)));
}

std::optional<unsigned long> parseBrightness(const std::string& text) {
  const std::string digits = stripSpaces(text);
  if (digits.empty() || digits.size() > 9 ||
      !std::all_of(digits.begin(), digits.end(), [](char c) { return c >= '0' && c <= '9'; })) {
    return std::nullopt;
  }
  return std::stoul(digits);
}

// The state of one LED directory, or nothing when it cannot be read.
std::optional<unsigned int> readLedState(FileSystem& files, int classFd, const std::string& led) {
  std::string trigger = "none";
  const ReadResult triggerFile = readRegularFile(files, classFd, led + "/trigger", kAttributeLimit);
  if (triggerFile.ok()) {
    trigger = activeTrigger(triggerFile.data);
  } else if (triggerFile.error != ENOENT) {
    return std::nullopt;
  }
  std::optional<unsigned long> brightness;
  const ReadResult brightnessFile =
      readRegularFile(files, classFd, led + "/brightness", kAttributeLimit);
  if (brightnessFile.ok()) {
    brightness = parseBrightness(brightnessFile.data);
  }
  return ledAlarmState(trigger, brightness);
}

}  // namespace

LedName splitLedName(std::string_view name) {
  LedName parts;
  const std::string_view::size_type last = name.rfind(':');
  if (last == std::string_view::npos) {
    parts.function = std::string(name);
    return parts;
  }
  parts.function = std::string(name.substr(last + 1));
  const std::string_view front = name.substr(0, last);
  const std::string_view::size_type middle = front.rfind(':');
  if (middle == std::string_view::npos) {
    parts.colour = std::string(front);
    return parts;
  }
  parts.colour = std::string(front.substr(middle + 1));
  parts.device = std::string(front.substr(0, middle));
  return parts;
}

bool isBlueLight(const LedName& name) {
  return equalsIgnoringCase(name.colour, "blue") || isIdentifyLed(name);
}

bool isIdentifyLed(const LedName& name) {
  const std::string function = asciiLowerCopy(name.function);
  std::string_view rest = function;
  while (!rest.empty()) {
    const std::string_view::size_type end = rest.find_first_of("-_ ");
    if (contains(kIdentificationWords, rest.substr(0, end))) {
      return true;
    }
    if (end == std::string_view::npos) {
      break;
    }
    rest.remove_prefix(end + 1);
  }
  return false;
}

std::optional<unsigned int> ledAlarmState(std::string_view trigger,
                                          std::optional<unsigned long> brightness) {
  if (trigger == "default-on") {
    return kAlarmSteady;
  }
  if (std::find(kBlinkingTriggers.begin(), kBlinkingTriggers.end(), trigger) !=
      kBlinkingTriggers.end()) {
    return kAlarmAlternating;
  }
  if (!brightness) {
    return std::nullopt;
  }
  return *brightness == 0 ? kAlarmOff : kAlarmSteady;
}

std::vector<InstrumentationNode> SysfsLedSource::readNodes() const {
  const int opened = files_->openDirectory(kWorkingDirectory, directory_);
  if (opened < 0) {
    throw SourceError(errorText(-opened));
  }
  const FileSystemFd directory(*files_, opened);
  const int classFd = directory.get();

  std::vector<std::string> names;
  if (const int listed = files_->listDirectory(classFd, names); listed < 0) {
    throw SourceError(errorText(-listed));
  }
  std::vector<std::string> lights;
  for (std::string& name : names) {
    if (name.empty() || name.front() == '.') {
      continue;
    }
    // The class directory holds symbolic links to the devices' LED directories; follow them.
    struct stat info = {};
    if (files_->statAt(classFd, name, info) != 0 || !S_ISDIR(info.st_mode)) {
      continue;
    }
    const LedName parts = splitLedName(name);
    if (selection_ == LedSelection::IdentifyOnly ? isIdentifyLed(parts) : isBlueLight(parts)) {
      lights.push_back(std::move(name));
    }
  }
  std::sort(lights.begin(), lights.end());

  std::vector<InstrumentationNode> nodes;
  nodes.reserve(lights.size());
  for (std::string& light : lights) {
    InstrumentationNode node;
    node.type = NodeLexicon::NODE_TYPE_BLUE_LIGHT;
    node.description = kSysfsLedDescription;
    if (const std::optional<unsigned int> state = readLedState(*files_, classFd, light)) {
      node.status = kStatusReadable;
      node.properties.push_back({NodeLexicon::PROPERTY_ALARM_STATE, *state});
    }
    node.path = std::move(light);
    nodes.push_back(std::move(node));
  }
  return nodes;
}

std::unique_ptr<InstrumentationSource> makeSysfsLedSource(std::string_view rest,
                                                          std::shared_ptr<FileSystem> files) {
  // A '?' starts the options, as in every other source text; no LED class folder has one.
  const auto [directory, optionText] = splitAtQuestionMark(rest);
  std::map<std::string, std::string> options = parseOptionList(optionText);
  LedSelection selection = LedSelection::BlueOrIdentify;
  if (auto found = options.find("lights"); found != options.end()) {
    if (equalsIgnoringCase(found->second, "identify")) {
      selection = LedSelection::IdentifyOnly;
    } else if (!equalsIgnoringCase(found->second, "blue-or-identify")) {
      throw SourceError("lights=" + printable(found->second) +
                        " must be lights=identify or lights=blue-or-identify");
    }
    options.erase(found);
  }
  refuseUnknownOptions(options, "lights");
  return std::make_unique<SysfsLedSource>(
      directory.empty() ? std::string(kDefaultSysfsLedDirectory) : std::string(directory),
      std::move(files), selection);
}

}  // namespace platform
}  // namespace Kesta
