#include "instrumentation/PluginLoader.h"

#include <dlfcn.h>
#include <sys/stat.h>

#include <algorithm>
#include <filesystem>

#include "instrumentation/SourceError.h"
#include "os/BinaryLocation.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

using EntryPoint = const void* (*)();

bool exists(const std::string& path) {
  struct stat info = {};
  return ::stat(path.c_str(), &info) == 0;
}

// Loads the plug-in at `path`; returns its table, or null with `why` filled in.
const void* load(const std::string& path, const PluginSpec& spec, std::string& why) {
  ::dlerror();
  void* handle = ::dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (handle == nullptr) {
    const char* error = ::dlerror();
    why = std::string(spec.what) + " \"" + printable(path) + "\" cannot be loaded: " +
          (error != nullptr ? printable(error) : std::string("unknown error")) + " (" +
          spec.runtimeHint + ")";
    return nullptr;
  }
  const auto entry = reinterpret_cast<EntryPoint>(::dlsym(handle, spec.entryPoint));
  const void* table = entry != nullptr ? entry() : nullptr;
  if (table == nullptr || (spec.complete != nullptr && !spec.complete(table))) {
    why = "\"" + printable(path) + "\" is not " + spec.what + " (no " + spec.entryPoint + ")";
    ::dlclose(handle);
    return nullptr;
  }
  // Every table starts with its version.
  const unsigned int version = *static_cast<const unsigned int*>(table);
  if (version != spec.abiVersion) {
    why = std::string(spec.what) + " \"" + printable(path) + "\" is of version " +
          std::to_string(version) + ", but this provider needs version " +
          std::to_string(spec.abiVersion);
    ::dlclose(handle);
    return nullptr;
  }
  // The handle is deliberately never closed (see PluginLoader.h).
  return table;
}

}  // namespace

std::vector<std::string> pluginCandidates(const std::string& binaryDirectory,
                                          const PluginSpec& spec) {
  std::vector<std::string> candidates;
  const auto add = [&candidates](const std::filesystem::path& path) {
    std::string normal = path.lexically_normal().string();
    if (std::find(candidates.begin(), candidates.end(), normal) == candidates.end()) {
      candidates.push_back(std::move(normal));
    }
  };
  if (!binaryDirectory.empty()) {
    const std::filesystem::path binary(binaryDirectory);
    add(binary / spec.folder / spec.file);
    add(binary / ".." / "lib" / spec.folder / spec.file);
  }
  add(std::filesystem::path(spec.installDir) / spec.file);
  return candidates;
}

const void* loadPlugin(const PluginSpec& spec) {
  const std::vector<std::string> candidates = pluginCandidates(ownBinaryDirectory(), spec);
  for (const std::string& candidate : candidates) {
    if (!exists(candidate)) {
      continue;
    }
    std::string why;
    const void* table = load(candidate, spec, why);
    if (table == nullptr) {
      throw SourceError(why);
    }
    return table;
  }
  std::string looked;
  for (const std::string& candidate : candidates) {
    looked += (looked.empty() ? "" : ", ") + printable(candidate);
  }
  if (!spec.built) {
    throw SourceError(std::string(spec.notBuilt) + "; looked in " + looked);
  }
  throw SourceError(std::string(spec.what) + " " + spec.file + " is not installed (looked in " +
                    looked + ")");
}

}  // namespace platform
}  // namespace Kesta
