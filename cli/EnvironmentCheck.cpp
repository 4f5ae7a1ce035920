#include "EnvironmentCheck.h"

#include <unistd.h>

#include <filesystem>
#include <string_view>
#include <system_error>

#include "KestaCommonBase.h"
#include "instrumentation/SourceList.h"

namespace bluelight::cli {

namespace {

constexpr std::string_view kFileScheme = "file:";

// True for a "file:" source whose file this process can read.
bool readableFile(const std::string& source) {
  const std::string file = source.substr(kFileScheme.size());
  std::error_code error;
  return !file.empty() && std::filesystem::is_regular_file(file, error) &&
         ::access(file.c_str(), R_OK) == 0;
}

bool isFileSource(const std::string& source) {
  return source.compare(0, kFileScheme.size(), kFileScheme) == 0;
}

}  // namespace

std::optional<std::string> instrumentationRemark(const char* setting) {
  if (setting == nullptr) return std::nullopt;
  // The provider reads the setting without its surrounding blanks; so does this check.
  const std::string source = Kesta::stripSpaces(setting);
  if (Kesta::platform::isSourceList(source)) {
    // In a list an unreadable file costs only its own lights.
    for (const std::string& entry : Kesta::platform::parseSourceList(source).entries) {
      if (isFileSource(entry) && !readableFile(entry)) {
        return "KESTA_INSTRUMENTATION lists " + entry +
               ", which cannot be read: its lights are missing (bluelight-cli discover tells what "
               "each source gave)";
      }
    }
    return std::nullopt;
  }
  if (!isFileSource(source) || readableFile(source)) return std::nullopt;
  return "KESTA_INSTRUMENTATION names " + source +
         ", which cannot be read: the provider finds no lights (VNLOG_SINK=stderr shows its log)";
}

}  // namespace bluelight::cli
