#include "EnvironmentCheck.h"

#include <unistd.h>

#include <filesystem>
#include <string_view>
#include <system_error>

#include "KestaCommonBase.h"

namespace bluelight::cli {

std::optional<std::string> instrumentationRemark(const char* setting) {
  if (setting == nullptr) return std::nullopt;
  // The provider reads the setting without its surrounding blanks; so does this check.
  const std::string source = Kesta::stripSpaces(setting);
  constexpr std::string_view scheme = "file:";
  if (source.compare(0, scheme.size(), scheme) != 0) return std::nullopt;
  const std::string file = source.substr(scheme.size());
  std::error_code error;
  if (!file.empty() && std::filesystem::is_regular_file(file, error) &&
      ::access(file.c_str(), R_OK) == 0) {
    return std::nullopt;
  }
  return "KESTA_INSTRUMENTATION names " + source +
         ", which cannot be read: the provider finds no lights (VNLOG_SINK=stderr shows its log)";
}

}  // namespace bluelight::cli
