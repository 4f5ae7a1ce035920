#include "instrumentation/ipmi/IpmiSource.h"

#include <algorithm>
#include <map>
#include <utility>

#include "KestaCommonBase.h"
#include "VNLog.h"
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

// The same category and level as every other instrumentation failure, so one log filter catches
// them all.
constexpr const char* kCategory = "Kesta.Platform.Instrumentation";
constexpr int kFailureLevel = 6000;

bool isDigit(char c) { return c >= '0' && c <= '9'; }

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

bool isHostNameCharacter(char c) {
  return isDigit(c) || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '-' || c == '.' ||
         c == '_';
}

// Inside brackets: hexadecimal groups, dots of an embedded IPv4 address and a zone after '%'.
bool isBracketedAddressCharacter(char c) { return isHostNameCharacter(c) || c == ':' || c == '%'; }

bool isIpv6(const std::string& host) { return host.find(':') != std::string::npos; }

void logUnreadable(const std::string& source, const std::string& why) {
  VNLog::VNLogger::logLevelMessage(__func__, __FILE__, __LINE__, kCategory, kFailureLevel, nullptr,
                                   0, 0,
                                   "Instrumentation source \"" + printable(source) +
                                       "\" cannot read the identify light: " + why);
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
  if (where.empty()) {
    throw SourceError("no host is named after \"ipmi-lan:\"");
  }
  std::string_view host;
  std::string_view port;
  if (where.front() == '[') {
    const std::string_view::size_type close = where.find(']');
    if (close == std::string_view::npos) {
      throw SourceError("the address \"" + printable(where) + "\" has no closing ']'");
    }
    host = where.substr(1, close - 1);
    const std::string_view after = where.substr(close + 1);
    if (!after.empty()) {
      if (after.front() != ':') {
        throw SourceError("only \":<port>\" may follow the address in brackets");
      }
      port = after.substr(1);
      if (port.empty()) {
        throw SourceError("no port follows the ':' after the address");
      }
    }
    if (host.find(':') == std::string_view::npos ||
        !std::all_of(host.begin(), host.end(), isBracketedAddressCharacter)) {
      throw SourceError("\"" + printable(host) + "\" in brackets is not an IPv6 address");
    }
  } else {
    const std::string_view::size_type colon = where.find(':');
    if (colon != std::string_view::npos && where.find(':', colon + 1) != std::string_view::npos) {
      throw SourceError("an IPv6 address is written in brackets, e.g. ipmi-lan:[fd00::5]:623");
    }
    host = where.substr(0, colon);
    if (colon != std::string_view::npos) {
      port = where.substr(colon + 1);
      if (port.empty()) {
        throw SourceError("no port follows the ':' after the host");
      }
    }
    if (host.empty() || !std::all_of(host.begin(), host.end(), isHostNameCharacter)) {
      throw SourceError("\"" + printable(host) + "\" is not a host name or IPv4 address");
    }
  }
  settings.host = asciiLowerCopy(host);
  if (!port.empty()) {
    settings.port = parsePortText(port);
  }

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
  const std::string host = isIpv6(settings.host) ? "[" + settings.host + "]" : settings.host;
  return std::string(kLanScheme) + host + ":" + std::to_string(settings.port);
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
