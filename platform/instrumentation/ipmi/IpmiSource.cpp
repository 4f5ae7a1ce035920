#include "instrumentation/ipmi/IpmiSource.h"

#include <algorithm>
#include <map>
#include <utility>

#include "KestaCommonBase.h"
#include "instrumentation/SourceLog.h"
#include "instrumentation/SourceOptions.h"
#include "instrumentation/ipmi/IpmiCredentials.h"
#include "instrumentation/ipmi/IpmiDeviceTransport.h"
#include "instrumentation/ipmi/IpmiLanTransport.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

constexpr const char* kDeviceScheme = "ipmi:";
constexpr const char* kLanScheme = "ipmi-lan:";

// Takes the shared options out of `options`; whatever remains is unknown.
IpmiSourceOptions takeSharedOptions(std::map<std::string, std::string>& options) {
  IpmiSourceOptions shared;
  if (auto found = options.find("description"); found != options.end()) {
    shared.description = parseDescriptionOption(found->second);
    options.erase(found);
  }
  if (auto found = options.find("timeout"); found != options.end()) {
    shared.timeout = parseTimeoutOption(found->second, kIpmiShortestTimeout, kIpmiLongestTimeout);
    options.erase(found);
  }
  if (auto found = options.find("on"); found != options.end()) {
    shared.onReport = parseOnOption(found->second);
    options.erase(found);
  }
  return shared;
}

void logUnreadable(const std::string& source, const std::string& why) {
  logSourceProblem(describeSource(source, "") + " cannot read the identify light: " + why);
}

}  // namespace

IpmiDeviceSourceSettings parseIpmiDeviceSource(std::string_view rest) {
  const auto [device, optionText] = splitAtQuestionMark(rest);
  std::map<std::string, std::string> options = parseOptionList(optionText);
  IpmiDeviceSourceSettings settings;
  settings.options = takeSharedOptions(options);
  refuseUnknownOptions(options, "description, timeout or on");
  if (device.empty()) {
    settings.device = kDefaultIpmiDevice;
  } else if (device.front() != '/') {
    throw SourceError("the IPMI device \"" + printable(device) +
                      "\" is not an absolute path such as /dev/ipmi0 (a BMC on the network is "
                      "ipmi-lan:<host>?credentials=<file>)");
  } else {
    settings.device = std::string(device);
  }
  return settings;
}

IpmiLanSourceSettings parseIpmiLanSource(std::string_view rest) {
  const auto [where, optionText] = splitAtQuestionMark(rest);
  IpmiLanSourceSettings settings;
  const HostAndPort address = parseHostAndPort(where, kLanScheme, "ipmi-lan:[fd00::5]:623");
  settings.host = address.host;
  settings.port = address.port.value_or(kIpmiLanDefaultPort);

  std::map<std::string, std::string> options = parseOptionList(optionText);
  settings.options = takeSharedOptions(options);
  if (auto found = options.find("credentials"); found != options.end()) {
    settings.credentialsFile = found->second;
    options.erase(found);
  }
  refuseUnknownOptions(options, "credentials, description, timeout or on");
  if (settings.credentialsFile.empty()) {
    throw SourceError(
        "a BMC on the network needs credentials=<file>, a file that only its owner can read");
  }
  if (settings.credentialsFile.front() != '/') {
    throw SourceError("credentials=" + printable(settings.credentialsFile) +
                      " is not an absolute path");
  }
  return settings;
}

std::string ipmiDevicePath(const IpmiDeviceSourceSettings& settings) {
  return std::string(kDeviceScheme) + settings.device;
}

std::string ipmiLanPath(const IpmiLanSourceSettings& settings) {
  return std::string(kLanScheme) + bracketedHost(settings.host) + ":" +
         std::to_string(settings.port);
}

IpmiSource::TransportFactory ipmiDeviceTransportFactory(const IpmiDeviceSourceSettings& settings,
                                                        const IpmiSourceSystem& system) {
  return [file = settings.device, device = system.device, clock = system.clock]() {
    return std::make_unique<IpmiDeviceTransport>(file, device, clock);
  };
}

IpmiSource::TransportFactory ipmiLanTransportFactory(const IpmiLanSourceSettings& settings,
                                                     const IpmiSourceSystem& system) {
  return [host = settings.host, port = settings.port, file = settings.credentialsFile,
          files = system.files, clock = system.clock]() {
    IpmiLanTarget target;
    target.host = host;
    target.port = port;
    target.credentials = readIpmiCredentials(file, *files);
    return std::make_unique<IpmiLanTransport>(std::move(target), clock);
  };
}

std::unique_ptr<InstrumentationSource> makeIpmiSource(std::string_view text,
                                                      const IpmiSourceSystem& system) {
  const std::string name(text);
  const std::string_view lan = kLanScheme;
  const std::string_view device = kDeviceScheme;
  if (text.substr(0, lan.size()) == lan) {
    const IpmiLanSourceSettings settings = parseIpmiLanSource(text.substr(lan.size()));
    return std::make_unique<IpmiSource>(name, ipmiLanPath(settings), settings.options,
                                        ipmiLanTransportFactory(settings, system), system.clock);
  }
  if (text.substr(0, device.size()) == device) {
    const IpmiDeviceSourceSettings settings = parseIpmiDeviceSource(text.substr(device.size()));
    return std::make_unique<IpmiSource>(name, ipmiDevicePath(settings), settings.options,
                                        ipmiDeviceTransportFactory(settings, system), system.clock);
  }
  throw SourceError("not an IPMI source (expected ipmi:[<device>] or ipmi-lan:<host>)");
}

IpmiSource::IpmiSource(std::string name, std::string path, IpmiSourceOptions options,
                       TransportFactory transport, std::shared_ptr<const Clock> clock)
    : name_(std::move(name)),
      path_(std::move(path)),
      options_(std::move(options)),
      transport_(std::move(transport)),
      clock_(std::move(clock)) {}

std::vector<InstrumentationNode> IpmiSource::readNodes() const {
  // The clock starts before the transport is made, so reading the credentials and loading the
  // network transport count against the same timeout as the request.
  const IpmiClock::time_point deadline = clock_->now() + options_.timeout;
  const std::unique_ptr<IpmiTransport> transport = transport_();
  if (transport == nullptr) {
    throw SourceError("no transport to the BMC");
  }
  const IpmiResponse response =
      transport->transact({kIpmiChassisNetFn, kIpmiGetChassisStatus, {}}, deadline);
  IdentifyReading reading = IdentifyReading::unusable(response.failure);
  if (response.answered) {
    reading = decodeChassisStatus(response.data);
  } else if (response.timedOut) {
    reading.problem += " within " + millisecondsText(options_.timeout);
  }
  if (reading.kind == IdentifyReading::Kind::Unusable) {
    logUnreadable(name_, reading.problem);
  }
  return {identifyNode(reading, path_, options_.description, options_.onReport)};
}

}  // namespace platform
}  // namespace Kesta
