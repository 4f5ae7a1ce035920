#include "instrumentation/ipmi/IpmiSource.h"

#include <algorithm>
#include <map>
#include <utility>

#include "KestaCommonBase.h"
#include "VNLog.h"
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
bool isHexDigit(char c) { return isDigit(c) || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F'); }
int hexValue(char c) {
  if (isDigit(c)) {
    return c - '0';
  }
  return asciiLower(c) - 'a' + 10;
}

std::string percentDecoded(std::string_view value, std::string_view name) {
  std::string decoded;
  decoded.reserve(value.size());
  for (std::size_t i = 0; i < value.size(); ++i) {
    if (value[i] != '%') {
      decoded += value[i];
      continue;
    }
    if (i + 2 >= value.size() || !isHexDigit(value[i + 1]) || !isHexDigit(value[i + 2])) {
      throw SourceError("the value of \"" + std::string(name) +
                        "\" has a '%' that is not followed by two hexadecimal digits");
    }
    decoded += static_cast<char>(hexValue(value[i + 1]) * 16 + hexValue(value[i + 2]));
    i += 2;
  }
  return decoded;
}

// The name=value pairs of "?<options>" (or of nothing), decoded. Every name at most once.
std::map<std::string, std::string> parseOptionList(std::string_view text) {
  std::map<std::string, std::string> options;
  if (text.empty()) {
    return options;
  }
  text.remove_prefix(1);  // the '?'
  for (;;) {
    const std::string_view::size_type end = text.find('&');
    const std::string_view item = text.substr(0, end);
    const std::string_view::size_type equals = item.find('=');
    if (item.empty() || equals == std::string_view::npos || equals == 0) {
      throw SourceError("the options after '?' must be name=value pairs joined by '&'");
    }
    const std::string name(item.substr(0, equals));
    std::string value = percentDecoded(item.substr(equals + 1), name);
    if (!options.emplace(name, std::move(value)).second) {
      throw SourceError("the option \"" + printable(name) + "\" is given twice");
    }
    if (end == std::string_view::npos) {
      break;
    }
    text.remove_prefix(end + 1);
  }
  return options;
}

std::chrono::milliseconds parseTimeout(const std::string& text) {
  const auto bad = [&text]() -> SourceError {
    return SourceError("timeout=" + printable(text) +
                       " is not a duration such as 1, 0.5, 2.25 (seconds) or 250ms");
  };
  std::string_view number = text;
  long long scale = 1000;  // milliseconds per unit
  if (number.size() > 2 && number.substr(number.size() - 2) == "ms") {
    number.remove_suffix(2);
    scale = 1;
  } else if (number.size() > 1 && number.back() == 's') {
    number.remove_suffix(1);
  }
  const std::string_view::size_type point = number.find('.');
  const std::string_view whole = number.substr(0, point);
  const std::string_view fraction =
      point == std::string_view::npos ? std::string_view() : number.substr(point + 1);
  if (whole.empty() || whole.size() > 6 || !std::all_of(whole.begin(), whole.end(), isDigit) ||
      (point != std::string_view::npos &&
       (fraction.empty() || !std::all_of(fraction.begin(), fraction.end(), isDigit)))) {
    throw bad();
  }
  // Milliseconds are the finest unit the timeout has; finer fractions would be silently lost.
  if ((scale == 1 && !fraction.empty()) || fraction.size() > 3) {
    throw SourceError("timeout=" + printable(text) + " is finer than a millisecond");
  }
  long long milliseconds = std::stoll(std::string(whole)) * scale;
  if (!fraction.empty()) {
    std::string padded(fraction);
    padded.resize(3, '0');
    milliseconds += std::stoll(padded);
  }
  const std::chrono::milliseconds timeout(milliseconds);
  if (timeout < kIpmiShortestTimeout || timeout > kIpmiLongestTimeout) {
    throw SourceError("timeout=" + printable(text) + " is outside 10 ms to 60 s");
  }
  return timeout;
}

OnReport parseOn(const std::string& text) {
  if (equalsIgnoringCase(text, "alternating")) {
    return OnReport::Alternating;
  }
  if (equalsIgnoringCase(text, "steady")) {
    return OnReport::Steady;
  }
  throw SourceError("on=" + printable(text) + " must be on=alternating or on=steady");
}

std::string parseDescription(const std::string& text) {
  if (stripSpaces(text).empty()) {
    throw SourceError("description= names no description");
  }
  if (!isValidUtf8(text) || std::any_of(text.begin(), text.end(), [](char c) {
        return (static_cast<unsigned char>(c) < 0x20) || c == 0x7f;
      })) {
    throw SourceError("description= must be UTF-8 text without control characters");
  }
  return text;
}

// Takes the shared options out of `options`; whatever remains is unknown.
IpmiSourceOptions takeSharedOptions(std::map<std::string, std::string>& options) {
  IpmiSourceOptions shared;
  if (auto found = options.find("description"); found != options.end()) {
    shared.description = parseDescription(found->second);
    options.erase(found);
  }
  if (auto found = options.find("timeout"); found != options.end()) {
    shared.timeout = parseTimeout(found->second);
    options.erase(found);
  }
  if (auto found = options.find("on"); found != options.end()) {
    shared.onReport = parseOn(found->second);
    options.erase(found);
  }
  return shared;
}

void refuseUnknown(const std::map<std::string, std::string>& options, const char* expected) {
  if (!options.empty()) {
    throw SourceError("unknown option \"" + printable(options.begin()->first) + "\" (expected " +
                      expected + ")");
  }
}

// Splits "<head>?<options>" into "<head>" and "?<options>" (keeping the '?', so that a lone '?'
// is told apart from no options at all).
std::pair<std::string_view, std::string_view> splitAtQuestionMark(std::string_view rest) {
  const std::string_view::size_type question = rest.find('?');
  if (question == std::string_view::npos) {
    return {rest, std::string_view()};
  }
  return {rest.substr(0, question), rest.substr(question)};
}

unsigned int parsePort(std::string_view text) {
  if (text.empty() || text.size() > 5 || !std::all_of(text.begin(), text.end(), isDigit)) {
    throw SourceError("the port \"" + printable(text) + "\" is not a number from 1 to 65535");
  }
  const unsigned long port = std::stoul(std::string(text));
  if (port == 0 || port > 65535) {
    throw SourceError("the port \"" + printable(text) + "\" is not a number from 1 to 65535");
  }
  return static_cast<unsigned int>(port);
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
  refuseUnknown(options, "description, timeout or on");
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
    settings.port = parsePort(port);
  }

  std::map<std::string, std::string> options = parseOptionList(optionText);
  settings.options = takeSharedOptions(options);
  if (auto found = options.find("credentials"); found != options.end()) {
    settings.credentialsFile = found->second;
    options.erase(found);
  }
  refuseUnknown(options, "credentials, description, timeout or on");
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
