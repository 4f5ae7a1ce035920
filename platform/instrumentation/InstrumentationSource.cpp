#include "instrumentation/InstrumentationSource.h"

#include <cerrno>
#include <cstdlib>
#include <mutex>

#include "KestaCommonBase.h"
#include "instrumentation/enclosure/EnclosureSource.h"
#include "instrumentation/ipmi/IpmiSource.h"
#include "instrumentation/json/JsonFileSource.h"
#include "instrumentation/leds/SysfsLedSource.h"
#include "instrumentation/redfish/RedfishSource.h"
#include "os/FileIo.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

// Only the first line matters; the limit keeps a wrong file (a log, a binary) from being read
// whole on every operation.
constexpr std::size_t kConfigurationFileLimit = std::size_t{64} * 1024;

std::mutex configurationFileMutex;
std::string configurationFileOverride;  // guarded by configurationFileMutex

std::string configurationFile() {
  std::lock_guard<std::mutex> lock(configurationFileMutex);
  return configurationFileOverride.empty() ? kDefaultConfigurationFile : configurationFileOverride;
}

}  // namespace

InstrumentationSource::~InstrumentationSource() = default;

std::optional<unsigned int> InstrumentationNode::property(unsigned int number) const {
  for (const NodeProperty& entry : properties) {
    if (entry.number == number) {
      return entry.value;
    }
  }
  return std::nullopt;
}

std::unique_ptr<InstrumentationSource> makeInstrumentationSource(std::string_view text,
                                                                 const SourceSystem& system) {
  const std::string_view::size_type colon = text.find(':');
  const std::string_view scheme = text.substr(0, colon);
  const std::string_view rest =
      colon == std::string_view::npos ? std::string_view() : text.substr(colon + 1);
  if (colon != std::string_view::npos && scheme == "file") {
    if (rest.empty()) {
      throw SourceError("no file is named after \"file:\"");
    }
    return std::make_unique<JsonFileSource>(std::string(rest), system.files);
  }
  if (colon != std::string_view::npos && scheme == "sysfs") {
    return makeSysfsLedSource(rest, system.files);
  }
  if (colon != std::string_view::npos && scheme == "enclosure") {
    return makeEnclosureSource(rest, system.files);
  }
  if (colon != std::string_view::npos && (scheme == "ipmi" || scheme == "ipmi-lan")) {
    return makeIpmiSource(text, IpmiSourceSystem{system.clock, system.files, system.ipmiDevice});
  }
  if (colon != std::string_view::npos && scheme == "redfish") {
    return makeRedfishSource(text);
  }
  throw SourceError(
      "unknown kind of source (expected file:<path>, sysfs:<directory>, enclosure:[<directory>], "
      "ipmi:[<device>], ipmi-lan:<host>?credentials=<file> or "
      "redfish:https://<host>?credentials=<file>)");
}

std::unique_ptr<InstrumentationSource> makeInstrumentationSource(std::string_view text) {
  return makeInstrumentationSource(text, SourceSystem{});
}

SourceSetting configuredSource(FileSystem& files) {
  if (const char* variable = std::getenv("KESTA_INSTRUMENTATION"); variable != nullptr) {
    std::string text = stripSpaces(variable);
    if (!text.empty()) {
      return {std::move(text), "KESTA_INSTRUMENTATION"};
    }
  }
  const std::string file = configurationFile();
  ReadResult read = readRegularFile(files, file, kConfigurationFileLimit);
  if (read.error == ENOENT || read.error == ENOTDIR) {
    return {kDefaultSourceText, "default"};
  }
  if (!read.ok()) {
    throw SourceError("configuration file \"" + printable(file) +
                      "\" cannot be read: " + read.reason);
  }
  std::string firstLine = stripSpaces(read.data.substr(0, read.data.find('\n')));
  if (firstLine.empty()) {
    throw SourceError("the first line of configuration file \"" + printable(file) +
                      "\" names no source");
  }
  return {std::move(firstLine), file};
}

SourceSetting configuredSource() { return configuredSource(*systemFileSystem()); }

void setConfigurationFileForTesting(const std::string& path) {
  std::lock_guard<std::mutex> lock(configurationFileMutex);
  configurationFileOverride = path;
}

}  // namespace platform
}  // namespace Kesta
