// The grammar that source texts share: "<scheme>:<head>?<name>=<value>&..." with %XX escapes in
// the values, and the options several sources understand (timeout=, on=, description=). Every
// function throws SourceError with a reason a user can act on; the source adds which source it
// was.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_SOURCEOPTIONS_H
#define KESTA_PLATFORM_INSTRUMENTATION_SOURCEOPTIONS_H

#include <chrono>
#include <map>
#include <optional>
#include <string>
#include <string_view>

#include "instrumentation/IdentifyLight.h"

namespace Kesta {
namespace platform {

// "<head>?<options>" split into "<head>" and "?<options>"; the '?' is kept, so that a lone '?'
// is told apart from no options at all.
struct SplitSourceText {
  std::string_view head;
  std::string_view options;
};
SplitSourceText splitAtQuestionMark(std::string_view rest);

// The name=value pairs of "?<options>" (or of nothing), decoded. Every name at most once.
std::map<std::string, std::string> parseOptionList(std::string_view text);

// Throws when options are left that the source does not know; `expected` lists those it does,
// e.g. "description, timeout or on".
void refuseUnknownOptions(const std::map<std::string, std::string>& options, const char* expected);

// timeout=<seconds>, <seconds>s or <n>ms, from `shortest` to `longest`, to the millisecond.
std::chrono::milliseconds parseTimeoutOption(const std::string& text,
                                             std::chrono::milliseconds shortest,
                                             std::chrono::milliseconds longest);

// on=alternating or on=steady, in any letter case.
OnReport parseOnOption(const std::string& text);

// description=<text>: not blank, UTF-8, no control characters.
std::string parseDescriptionOption(const std::string& text);

// A port number from 1 to 65535, written in decimal.
unsigned int parsePortText(std::string_view text);

// "<host>[:<port>]": a host name or IPv4 address (letters, digits, '-', '.', '_'), or an IPv6
// address in brackets, e.g. "[fd00::5]:623", with an optional port.
struct HostAndPort {
  std::string host;  // in lower case; an IPv6 address without the brackets
  std::optional<unsigned int> port;
};
// `scheme` ("ipmi-lan:") and `ipv6Example` ("ipmi-lan:[fd00::5]:623") name the source in the
// messages.
HostAndPort parseHostAndPort(std::string_view where, std::string_view scheme,
                             std::string_view ipv6Example);

// The host as addresses and paths write it: an IPv6 address in brackets.
std::string bracketedHost(const std::string& host);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_SOURCEOPTIONS_H
