#include "LibraryLocation.h"

#include <filesystem>
#include <system_error>

namespace bluelight::cli {

namespace fs = std::filesystem;

const char* providerLibraryName() { return BLUELIGHT_CLI_LIBRARY_NAME; }

InstallLayout configuredLayout() {
  return InstallLayout{BLUELIGHT_CLI_INSTALL_LIBDIR, BLUELIGHT_CLI_PROVIDER_DIR,
                       BLUELIGHT_CLI_INSTALLED_LIBRARY};
}

std::vector<std::string> libraryCandidates(const std::string& executablePath,
                                           const InstallLayout& layout) {
  std::vector<std::string> candidates;
  auto add = [&](const fs::path& path) {
    const std::string text = path.lexically_normal().string();
    for (const std::string& known : candidates) {
      if (known == text) return;
    }
    candidates.push_back(text);
  };
  if (!executablePath.empty()) {
    const fs::path prefix = fs::path(executablePath).parent_path().parent_path();
    add(prefix / "lib" / providerLibraryName());
    add(prefix / layout.libDir / providerLibraryName());
    // An installation moved to another prefix keeps the library in its provider directory,
    // relative to the tool's prefix.
    const fs::path providerDir(layout.providerDir);
    if (providerDir.is_relative()) add(prefix / providerDir / providerLibraryName());
    add(prefix / layout.libDir / "cmpi" / providerLibraryName());
  }
  // Where the installation put it, however the tool was moved.
  add(layout.installedLibrary);
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
