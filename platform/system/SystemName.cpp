#include <netdb.h>
#include <sys/socket.h>
#include <unistd.h>

#include <climits>
#include <cstdlib>
#include <memory>
#include <optional>
#include <string>

#include "KestaCommonBase.h"

namespace Kesta {

namespace {

// The host's own name, or "localhost" in the odd case that even gethostname fails.
std::string hostName() {
  char buffer[HOST_NAME_MAX + 1] = {};
  if (::gethostname(buffer, sizeof buffer - 1) != 0 || buffer[0] == '\0') {
    return "localhost";
  }
  return buffer;
}

struct AddrInfoDeleter {
  void operator()(addrinfo* list) const { ::freeaddrinfo(list); }
};

// The canonical name of this host as the resolver knows it; nothing when it does not know one.
std::optional<std::string> canonicalHostName() {
  addrinfo hints = {};
  hints.ai_family = AF_UNSPEC;
  hints.ai_socktype = SOCK_STREAM;
  hints.ai_flags = AI_CANONNAME;
  addrinfo* found = nullptr;
  if (::getaddrinfo(hostName().c_str(), nullptr, &hints, &found) != 0) {
    return std::nullopt;
  }
  const std::unique_ptr<addrinfo, AddrInfoDeleter> list(found);
  if (list == nullptr || list->ai_canonname == nullptr || list->ai_canonname[0] == '\0') {
    return std::nullopt;
  }
  return std::string(list->ai_canonname);
}

}  // namespace

std::string getSystemName() {
  if (const char* configured = std::getenv("KESTA_SYSTEM_NAME");
      configured != nullptr && *configured != '\0') {
    return configured;
  }
  // The lookup may wait for DNS time-outs, so it is made once per process; a failed lookup is
  // remembered as well rather than repeated on every operation. The initialisation of a local
  // static is thread-safe.
  static const std::optional<std::string> canonical = canonicalHostName();
  return canonical ? *canonical : hostName();
}

}  // namespace Kesta
