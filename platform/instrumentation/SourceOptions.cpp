#include "instrumentation/SourceOptions.h"

#include <algorithm>
#include <utility>

#include "KestaCommonBase.h"
#include "instrumentation/SourceError.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

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

bool isHostNameCharacter(char c) {
  return isDigit(c) || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '-' || c == '.' ||
         c == '_';
}

// Inside brackets: hexadecimal groups, dots of an embedded IPv4 address and a zone after '%'.
bool isBracketedAddressCharacter(char c) { return isHostNameCharacter(c) || c == ':' || c == '%'; }

// "250 ms", or "60 s" for whole seconds, as the range of a duration option is written.
std::string durationText(std::chrono::milliseconds duration) {
  if (duration.count() % 1000 == 0) {
    return std::to_string(duration.count() / 1000) + " s";
  }
  return std::to_string(duration.count()) + " ms";
}

}  // namespace

SplitSourceText splitAtQuestionMark(std::string_view rest) {
  const std::string_view::size_type question = rest.find('?');
  if (question == std::string_view::npos) {
    return {rest, std::string_view()};
  }
  return {rest.substr(0, question), rest.substr(question)};
}

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

void refuseUnknownOptions(const std::map<std::string, std::string>& options, const char* expected) {
  if (!options.empty()) {
    throw SourceError("unknown option \"" + printable(options.begin()->first) + "\" (expected " +
                      expected + ")");
  }
}

std::chrono::milliseconds parseTimeoutOption(const std::string& text,
                                             std::chrono::milliseconds shortest,
                                             std::chrono::milliseconds longest) {
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
  if (timeout < shortest || timeout > longest) {
    throw SourceError("timeout=" + printable(text) + " is outside " + durationText(shortest) +
                      " to " + durationText(longest));
  }
  return timeout;
}

OnReport parseOnOption(const std::string& text) {
  if (equalsIgnoringCase(text, "alternating")) {
    return OnReport::Alternating;
  }
  if (equalsIgnoringCase(text, "steady")) {
    return OnReport::Steady;
  }
  throw SourceError("on=" + printable(text) + " must be on=alternating or on=steady");
}

std::string parseDescriptionOption(const std::string& text) {
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

unsigned int parsePortText(std::string_view text) {
  if (text.empty() || text.size() > 5 || !std::all_of(text.begin(), text.end(), isDigit)) {
    throw SourceError("the port \"" + printable(text) + "\" is not a number from 1 to 65535");
  }
  const unsigned long port = std::stoul(std::string(text));
  if (port == 0 || port > 65535) {
    throw SourceError("the port \"" + printable(text) + "\" is not a number from 1 to 65535");
  }
  return static_cast<unsigned int>(port);
}

HostAndPort parseHostAndPort(std::string_view where, std::string_view scheme,
                             std::string_view ipv6Example) {
  if (where.empty()) {
    throw SourceError("no host is named after \"" + std::string(scheme) + "\"");
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
      throw SourceError("an IPv6 address is written in brackets, e.g. " + std::string(ipv6Example));
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
  HostAndPort parsed;
  parsed.host = asciiLowerCopy(host);
  if (!port.empty()) {
    parsed.port = parsePortText(port);
  }
  return parsed;
}

std::string bracketedHost(const std::string& host) {
  return host.find(':') != std::string::npos ? "[" + host + "]" : host;
}

}  // namespace platform
}  // namespace Kesta
