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
const void* load(const std::string& path, const PluginDescription& plugin, std::string& why) {
  ::dlerror();
  void* handle = ::dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (handle == nullptr) {
    const char* error = ::dlerror();
    why = std::string(plugin.what) + " \"" + printable(path) + "\" cannot be loaded: " +
          (error != nullptr ? printable(error) : std::string("unknown error")) + " (" +
          plugin.runtimeHint + ")";
    return nullptr;
  }
  const auto entry = reinterpret_cast<EntryPoint>(::dlsym(handle, plugin.entryPoint));
  const void* table = entry != nullptr ? entry() : nullptr;
  if (table == nullptr || (plugin.complete != nullptr && !plugin.complete(table))) {
    why = "\"" + printable(path) + "\" is not " + plugin.what + " (no " + plugin.entryPoint + ")";
    ::dlclose(handle);
    return nullptr;
  }
  // Every table starts with its version.
  const unsigned int version = *static_cast<const unsigned int*>(table);
  if (version != plugin.abiVersion) {
    why = std::string(plugin.what) + " \"" + printable(path) + "\" is of version " +
          std::to_string(version) + ", but this provider needs version " +
          std::to_string(plugin.abiVersion);
    ::dlclose(handle);
    return nullptr;
  }
  // The handle is deliberately never closed (see PluginLoader.h).
  return table;
}

}  // namespace

std::vector<std::string> pluginCandidates(const std::string& binaryDirectory,
                                          const PluginDescription& plugin) {
  std::vector<std::string> candidates;
  const auto add = [&candidates](const std::filesystem::path& path) {
    std::string normal = path.lexically_normal().string();
    if (std::find(candidates.begin(), candidates.end(), normal) == candidates.end()) {
      candidates.push_back(std::move(normal));
    }
  };
  if (!binaryDirectory.empty()) {
    const std::filesystem::path binary(binaryDirectory);
    add(binary / plugin.folder / plugin.file);
    add(binary / ".." / "lib" / plugin.folder / plugin.file);
  }
  add(std::filesystem::path(plugin.installDir) / plugin.file);
  return candidates;
}

const void* loadPlugin(const PluginDescription& plugin) {
  const std::vector<std::string> candidates = pluginCandidates(ownBinaryDirectory(), plugin);
  for (const std::string& candidate : candidates) {
    if (!exists(candidate)) {
      continue;
    }
    std::string why;
    const void* table = load(candidate, plugin, why);
    if (table == nullptr) {
      throw SourceError(why);
    }
    return table;
  }
  std::string looked;
  for (const std::string& candidate : candidates) {
    looked += (looked.empty() ? "" : ", ") + printable(candidate);
  }
  if (!plugin.built) {
    throw SourceError(std::string(plugin.notBuilt) + "; looked in " + looked);
  }
  throw SourceError(std::string(plugin.what) + " " + plugin.file + " is not installed (looked in " +
                    looked + ")");
}

}  // namespace platform
}  // namespace Kesta
