#include "instrumentation/ipmi/IpmiLanTransport.h"

#include <dlfcn.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstring>
#include <filesystem>
#include <limits>
#include <mutex>

#include "instrumentation/SourceError.h"
#include "instrumentation/ipmi/IpmiBuildConfig.h"
#include "os/BinaryLocation.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

std::mutex pluginMutex;
const BluelightIpmiLanApi* loadedPlugin = nullptr;  // guarded by pluginMutex; never unloaded

bool exists(const std::string& path) {
  struct stat info = {};
  return ::stat(path.c_str(), &info) == 0;
}

// Loads the plug-in at `path`; returns its table, or null with `why` filled in.
const BluelightIpmiLanApi* load(const std::string& path, std::string& why) {
  ::dlerror();
  void* handle = ::dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (handle == nullptr) {
    const char* error = ::dlerror();
    why = "the network transport \"" + printable(path) + "\" cannot be loaded: " +
          (error != nullptr ? printable(error) : std::string("unknown error")) +
          " (it needs OpenIPMI's libraries: Debian package libopenipmi0)";
    return nullptr;
  }
  const auto entry =
      reinterpret_cast<BluelightIpmiLanEntryPoint>(::dlsym(handle, BLUELIGHT_IPMI_LAN_ENTRY_POINT));
  const BluelightIpmiLanApi* api = entry != nullptr ? entry() : nullptr;
  if (api == nullptr || api->transact == nullptr) {
    why = "\"" + printable(path) + "\" is not the network transport (no " +
          BLUELIGHT_IPMI_LAN_ENTRY_POINT + ")";
    ::dlclose(handle);
    return nullptr;
  }
  if (api->abiVersion != BLUELIGHT_IPMI_LAN_ABI_VERSION) {
    why = "the network transport \"" + printable(path) + "\" is of version " +
          std::to_string(api->abiVersion) + ", but this provider needs version " +
          std::to_string(BLUELIGHT_IPMI_LAN_ABI_VERSION);
    ::dlclose(handle);
    return nullptr;
  }
  // Deliberately kept open for the life of the process: the plug-in runs a thread that holds the
  // BMC sessions, and unloading code under a running thread would crash the object manager.
  return api;
}

}  // namespace

std::vector<std::string> ipmiLanPluginCandidates(const std::string& binaryDirectory) {
  std::vector<std::string> candidates;
  const auto add = [&candidates](const std::filesystem::path& path) {
    std::string normal = path.lexically_normal().string();
    if (std::find(candidates.begin(), candidates.end(), normal) == candidates.end()) {
      candidates.push_back(std::move(normal));
    }
  };
  if (!binaryDirectory.empty()) {
    const std::filesystem::path binary(binaryDirectory);
    add(binary / BLUELIGHT_IPMI_LAN_PLUGIN_FOLDER / BLUELIGHT_IPMI_LAN_PLUGIN_FILE);
    add(binary / ".." / "lib" / BLUELIGHT_IPMI_LAN_PLUGIN_FOLDER / BLUELIGHT_IPMI_LAN_PLUGIN_FILE);
  }
  add(std::filesystem::path(BLUELIGHT_IPMI_LAN_PLUGIN_INSTALL_DIR) /
      BLUELIGHT_IPMI_LAN_PLUGIN_FILE);
  return candidates;
}

const BluelightIpmiLanApi& ipmiLanPlugin() {
  std::lock_guard<std::mutex> lock(pluginMutex);
  if (loadedPlugin != nullptr) {
    return *loadedPlugin;
  }
  const std::vector<std::string> candidates = ipmiLanPluginCandidates(ownBinaryDirectory());
  for (const std::string& candidate : candidates) {
    if (!exists(candidate)) {
      continue;
    }
    // The first file found decides: loading a second, older copy instead would hide the problem.
    std::string why;
    loadedPlugin = load(candidate, why);
    if (loadedPlugin == nullptr) {
      throw SourceError(why);
    }
    return *loadedPlugin;
  }
  std::string looked;
  for (const std::string& candidate : candidates) {
    looked += (looked.empty() ? "" : ", ") + printable(candidate);
  }
  if (BLUELIGHT_IPMI_LAN_PLUGIN_BUILT == 0) {
    throw SourceError(
        "this build has no network transport for ipmi-lan: sources (OpenIPMI was not found when "
        "it was configured); looked in " +
        looked);
  }
  throw SourceError(std::string("the network transport ") + BLUELIGHT_IPMI_LAN_PLUGIN_FILE +
                    " is not installed (looked in " + looked + ")");
}

IpmiLanTransport::IpmiLanTransport(IpmiLanTarget target, std::shared_ptr<const Clock> clock)
    : target_(std::move(target)), clock_(std::move(clock)), api_(&ipmiLanPlugin()) {}

IpmiResponse IpmiLanTransport::transact(const IpmiRequest& request,
                                        IpmiClock::time_point deadline) const {
  const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - clock_->now());
  if (left.count() <= 0) {
    return IpmiResponse::timeout("no time was left to ask the BMC");
  }
  if (request.data.size() > BLUELIGHT_IPMI_LAN_MAX_DATA) {
    return IpmiResponse::failed("the request is too long");
  }

  BluelightIpmiLanTarget target = {};
  target.host = target_.host.c_str();
  target.port = target_.port;
  target.user = reinterpret_cast<const unsigned char*>(target_.credentials.user.data());
  target.userLength = static_cast<unsigned int>(target_.credentials.user.size());
  target.password = reinterpret_cast<const unsigned char*>(target_.credentials.password.data());
  target.passwordLength = static_cast<unsigned int>(target_.credentials.password.size());
  target.privilege = static_cast<unsigned int>(target_.credentials.privilege);
  target.cipherSuite = target_.credentials.cipherSuite;

  BluelightIpmiLanResult result = {};
  const auto milliseconds = static_cast<unsigned int>(
      std::min<long long>(left.count(), std::numeric_limits<unsigned int>::max()));
  api_->transact(&target, request.netFn, request.command,
                 request.data.empty() ? nullptr : request.data.data(),
                 static_cast<unsigned int>(request.data.size()), milliseconds, &result);

  result.reason[BLUELIGHT_IPMI_LAN_MAX_REASON - 1] = '\0';
  const std::string reason = printable(result.reason);
  switch (result.outcome) {
    case BLUELIGHT_IPMI_LAN_ANSWERED: {
      const std::size_t length = std::min<std::size_t>(result.length, sizeof result.data);
      return IpmiResponse::answer(std::vector<std::uint8_t>(result.data, result.data + length));
    }
    case BLUELIGHT_IPMI_LAN_TIMED_OUT:
      return IpmiResponse::timeout(reason.empty() ? "no answer from the BMC" : reason);
    default:
      return IpmiResponse::failed(reason.empty() ? "the request failed" : reason);
  }
}

}  // namespace platform
}  // namespace Kesta
