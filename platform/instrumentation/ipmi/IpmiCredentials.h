// The account an "ipmi-lan:" source logs in with. It comes from a file that only its owner can
// read - never from the source text, the environment or the command line, which other users of
// the machine can see - and it is never written to a log.
//
// The file holds "name = value" lines; blank lines and lines starting with '#' are ignored:
//
//   user = monitor
//   password = s3cret
//   privilege = user          (optional: user, operator or administrator; default user)
//   cipher-suite = 3          (optional: 1, 2, 3, 6, 7, 8, 11 or 12; default 3)
#ifndef KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMICREDENTIALS_H
#define KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMICREDENTIALS_H

#include <string>
#include <string_view>

#include "instrumentation/CredentialsFile.h"
#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

enum class IpmiPrivilege : unsigned int { User = 2, Operator = 3, Administrator = 4 };

constexpr std::size_t kIpmiUserMax = 16;
constexpr std::size_t kIpmiPasswordMax = 20;
constexpr unsigned int kDefaultIpmiCipherSuite = 3;  // HMAC-SHA1 login, SHA1-96 integrity, AES

// The user name and password are wiped from memory when the object goes.
struct IpmiCredentials {
  std::string user;
  std::string password;
  IpmiPrivilege privilege = IpmiPrivilege::User;
  unsigned int cipherSuite = kDefaultIpmiCipherSuite;

  IpmiCredentials() = default;
  IpmiCredentials(const IpmiCredentials&) = default;
  IpmiCredentials(IpmiCredentials&&) = default;
  IpmiCredentials& operator=(const IpmiCredentials&) = default;
  IpmiCredentials& operator=(IpmiCredentials&&) = default;
  ~IpmiCredentials();
};

// True for the cipher suites the network transport offers. Suite 0 (no authentication at all)
// is refused on purpose.
bool isSupportedCipherSuite(unsigned int suite);

// Parses the text of a credentials file; `file` only names it in messages. Throws SourceError
// for a line that is not "name = value", an unknown or repeated name, a missing user or
// password line, a user name over 16 bytes, a password over 20 bytes, an unknown privilege or an
// unsupported cipher suite. The messages name the line and the name, never a value.
IpmiCredentials parseIpmiCredentials(std::string_view text, const std::string& file);

// Reads and parses the credentials file at `file` through `files` by the rules every credentials
// file follows (readCredentialsFile in CredentialsFile.h). Throws SourceError.
IpmiCredentials readIpmiCredentials(const std::string& file, FileSystem& files);
// The same through the real file system.
IpmiCredentials readIpmiCredentials(const std::string& file);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMICREDENTIALS_H
