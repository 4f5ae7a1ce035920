// Fuzz target: the object-path text that users type on the command line of bluelight-cli.
//
// The input is read as a path and as a class path. A text that reads is written back with
// formatPath, and that text must read again to an equal path and be written the same way: the
// tool prints the paths it gets so that they can be pasted into the next command. (A NUL byte
// cannot be written back - formatPath makes it \x0000, which the reader refuses - so the reader
// refuses a raw one too.)
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>

#include "PathText.h"
#include "UsageError.h"

namespace {

[[noreturn]] void fail(const char* what, const std::string& first, const std::string& second) {
  std::fprintf(stderr, "fuzz_object_path: %s\n  first:  %s\n  second: %s\n", what, first.c_str(),
               second.c_str());
  std::abort();
}

// Writes the path, reads it back and writes it again.
void checkRoundTrip(const cmpihost::ObjectPathValue& path, const std::string& defaultNamespace) {
  const std::string written = bluelight::cli::formatPath(path);
  cmpihost::ObjectPathValue again;
  try {
    again = bluelight::cli::parseObjectPath(written, defaultNamespace);
  } catch (const bluelight::cli::UsageError& error) {
    fail("a written path does not read back", written, error.what());
  }
  if (again != path) fail("a written path reads back as another path", written, again.toString());
  if (bluelight::cli::formatPath(again) != written) {
    fail("a path is written in two ways", written, bluelight::cli::formatPath(again));
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string_view text(reinterpret_cast<const char*>(data), size);
  const std::string defaultNamespace = "root/cimv2";

  try {
    const cmpihost::ObjectPathValue path = bluelight::cli::parseObjectPath(text, defaultNamespace);
    if (!bluelight::cli::isCimName(path.className())) {
      fail("the class name is not a CIM name", path.className(), "");
    }
    for (const cmpihost::KeyBinding& key : path.keys()) {
      if (!bluelight::cli::isCimName(key.name)) fail("a key name is not a CIM name", key.name, "");
    }
    checkRoundTrip(path, defaultNamespace);
  } catch (const bluelight::cli::UsageError&) {
    // Refused with an explanation: what the tool does with bad input.
  }

  try {
    const cmpihost::ObjectPathValue path = bluelight::cli::parseClassPath(text, defaultNamespace);
    if (!path.keys().empty()) fail("a class path has keys", std::string(text), path.toString());
  } catch (const bluelight::cli::UsageError&) {
  }
  return 0;
}
