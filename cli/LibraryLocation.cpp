#include "LibraryLocation.h"

#include <filesystem>
#include <system_error>

namespace bluelight::cli {

namespace fs = std::filesystem;

const char* providerLibraryName() { return BLUELIGHT_CLI_LIBRARY_NAME; }

std::vector<std::string> libraryCandidates(const std::string& executablePath) {
  std::vector<std::string> candidates;
  auto add = [&](const std::string& path) {
    for (const std::string& known : candidates) {
      if (known == path) return;
    }
    candidates.push_back(path);
  };
  if (!executablePath.empty()) {
    const fs::path prefix = fs::path(executablePath).parent_path().parent_path();
    add((prefix / "lib" / providerLibraryName()).lexically_normal().string());
    add((prefix / BLUELIGHT_CLI_INSTALL_LIBDIR / providerLibraryName())
            .lexically_normal()
            .string());
    // An installation moved to another prefix keeps the library in its CMPI directory.
    add((prefix / BLUELIGHT_CLI_INSTALL_LIBDIR / "cmpi" / providerLibraryName())
            .lexically_normal()
            .string());
  }
  add(BLUELIGHT_CLI_INSTALLED_LIBRARY);
  return candidates;
}

std::optional<std::string> firstExisting(const std::vector<std::string>& candidates) {
  for (const std::string& candidate : candidates) {
    std::error_code error;
    if (fs::is_regular_file(candidate, error)) return candidate;
  }
  return std::nullopt;
}

std::string currentExecutablePath(const char* argv0) {
  std::error_code error;
  const fs::path self = fs::read_symlink("/proc/self/exe", error);
  if (!error && !self.empty()) return self.string();
  if (argv0 == nullptr) return std::string();
  const fs::path given = fs::absolute(argv0, error);
  return error ? std::string(argv0) : given.string();
}

}  // namespace bluelight::cli
