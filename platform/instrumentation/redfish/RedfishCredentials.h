// The account a "redfish:" source logs in with (HTTP Basic authentication). It comes from a
// credentials file checked and read by the rules every credentials file follows
// (CredentialsFile.h): a regular file of the provider's user or root that nobody else may read.
//
//   user = monitor
//   password = s3cret
#ifndef KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHCREDENTIALS_H
#define KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHCREDENTIALS_H

#include <cstddef>
#include <string>
#include <string_view>

#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

constexpr std::size_t kRedfishUserMax = 256;
constexpr std::size_t kRedfishPasswordMax = 256;

// The user name and password are wiped from memory when the object goes.
struct RedfishCredentials {
  std::string user;
  std::string password;

  RedfishCredentials() = default;
  RedfishCredentials(const RedfishCredentials&) = default;
  RedfishCredentials(RedfishCredentials&&) = default;
  RedfishCredentials& operator=(const RedfishCredentials&) = default;
  RedfishCredentials& operator=(RedfishCredentials&&) = default;
  ~RedfishCredentials();
};

// Parses the text of a credentials file; `file` only names it in messages. Throws SourceError for
// what every credentials file refuses, an unknown name, a missing or empty user, a missing
// password, a user name holding ':' (HTTP Basic authentication cannot carry it) and a user name
// or password over 256 bytes. The messages name the line and the name, never a value.
RedfishCredentials parseRedfishCredentials(std::string_view text, const std::string& file);

// Checks, reads and parses the credentials file at `file` through `files`. Throws SourceError.
RedfishCredentials readRedfishCredentials(const std::string& file, FileSystem& files);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHCREDENTIALS_H
