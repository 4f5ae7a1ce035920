// Where the tool looks for the provider library when --library does not say.
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace bluelight::cli {

/// The file name of the provider library, e.g. "libbluelightprofileprovider.so.1".
const char* providerLibraryName();

/// Where an installation puts things, as the build was configured.
struct InstallLayout {
  std::string libDir;  ///< the library directory relative to the prefix ("lib/x86_64-linux-gnu")
  std::string providerDir;       ///< the provider directory, relative to the prefix or absolute
  std::string installedLibrary;  ///< the library in the provider directory, absolute
};

/// The layout this tool was built for.
InstallLayout configuredLayout();

/// The places to look, in order: next to the tool (<dir of the tool>/../lib/, the install library
/// directory relative to the tool when that is another one, the provider directory relative to
/// the tool when it is relative, and the library directory's cmpi/ folder), then the configured
/// provider directory as an absolute path. An empty `executablePath` leaves the relative places
/// out.
std::vector<std::string> libraryCandidates(const std::string& executablePath,
                                           const InstallLayout& layout = configuredLayout());

/// The first candidate that is an existing file.
std::optional<std::string> firstExisting(const std::vector<std::string>& candidates);

/// The path of the running executable (from /proc/self/exe), else `argv0`.
std::string currentExecutablePath(const char* argv0);

}  // namespace bluelight::cli
