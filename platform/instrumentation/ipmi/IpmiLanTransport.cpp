#include "instrumentation/ipmi/IpmiLanTransport.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <mutex>

#include "instrumentation/PluginLoader.h"
#include "instrumentation/ipmi/IpmiBuildConfig.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

std::mutex pluginMutex;
const BluelightIpmiLanApi* loadedPlugin = nullptr;  // guarded by pluginMutex; never unloaded

bool isComplete(const void* table) {
  return static_cast<const BluelightIpmiLanApi*>(table)->transact != nullptr;
}

PluginDescription ipmiLanPluginDescription() {
  PluginDescription plugin;
  plugin.file = BLUELIGHT_IPMI_LAN_PLUGIN_FILE;
  plugin.folder = BLUELIGHT_IPMI_LAN_PLUGIN_FOLDER;
  plugin.installDir = BLUELIGHT_IPMI_LAN_PLUGIN_INSTALL_DIR;
  plugin.built = BLUELIGHT_IPMI_LAN_PLUGIN_BUILT != 0;
  plugin.entryPoint = BLUELIGHT_IPMI_LAN_ENTRY_POINT;
  plugin.abiVersion = BLUELIGHT_IPMI_LAN_ABI_VERSION;
  plugin.what = "the network transport";
  plugin.runtimeHint = "it needs OpenIPMI's libraries: Debian package libopenipmi0";
  plugin.notBuilt =
      "this build has no network transport for ipmi-lan: sources (OpenIPMI was not found when it "
      "was configured)";
  plugin.complete = isComplete;
  return plugin;
}

}  // namespace

std::vector<std::string> ipmiLanPluginCandidates(const std::string& binaryDirectory) {
  return pluginCandidates(binaryDirectory, ipmiLanPluginDescription());
}

// Never unloaded (as no plug-in is): this one runs a thread that holds the BMC sessions.
const BluelightIpmiLanApi& ipmiLanPlugin() {
  std::lock_guard<std::mutex> lock(pluginMutex);
  if (loadedPlugin == nullptr) {
    loadedPlugin = static_cast<const BluelightIpmiLanApi*>(loadPlugin(ipmiLanPluginDescription()));
  }
  return *loadedPlugin;
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
