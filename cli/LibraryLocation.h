// Where the tool looks for the provider library when --library does not say.
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace bluelight::cli {

/// The file name of the provider library, e.g. "libbluelightprofileprovider.so.1".
const char* providerLibraryName();

/// The places to look, in order: next to the tool (<dir of the tool>/../lib/, the install library
/// directory relative to the tool when that is another one, and its cmpi/ folder), then the
/// installed location.
/// An empty `executablePath` leaves the relative places out.
std::vector<std::string> libraryCandidates(const std::string& executablePath);

/// The first candidate that is an existing file.
std::optional<std::string> firstExisting(const std::vector<std::string>& candidates);

/// The path of the running executable (from /proc/self/exe), else `argv0`.
std::string currentExecutablePath(const char* argv0);

}  // namespace bluelight::cli
