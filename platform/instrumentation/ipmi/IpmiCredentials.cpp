#include "instrumentation/ipmi/IpmiCredentials.h"

#include <algorithm>
#include <array>

#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

constexpr std::array<unsigned int, 8> kCipherSuites = {1, 2, 3, 6, 7, 8, 11, 12};

IpmiPrivilege parsePrivilege(std::string_view value, const std::string& file, std::size_t line) {
  if (equalsIgnoringCase(value, "user")) {
    return IpmiPrivilege::User;
  }
  if (equalsIgnoringCase(value, "operator")) {
    return IpmiPrivilege::Operator;
  }
  if (equalsIgnoringCase(value, "administrator") || equalsIgnoringCase(value, "admin")) {
    return IpmiPrivilege::Administrator;
  }
  refuseCredentialsFile(
      file, credentialsLineText(line) + ": privilege must be user, operator or administrator");
}

unsigned int parseCipherSuite(std::string_view value, const std::string& file, std::size_t line) {
  unsigned int suite = 0;
  const bool digits =
      !value.empty() && value.size() <= 3 &&
      std::all_of(value.begin(), value.end(), [](char c) { return c >= '0' && c <= '9'; });
  if (digits) {
    for (const char c : value) {
      suite = suite * 10 + static_cast<unsigned int>(c - '0');
    }
  }
  if (!digits || !isSupportedCipherSuite(suite)) {
    refuseCredentialsFile(
        file, credentialsLineText(line) +
                  ": cipher-suite must be one of 1, 2, 3, 6, 7, 8, 11 or 12 (3 is the usual "
                  "choice; 0 would send no authentication and is refused)");
  }
  return suite;
}

}  // namespace

IpmiCredentials::~IpmiCredentials() {
  wipe(user);
  wipe(password);
}

bool isSupportedCipherSuite(unsigned int suite) {
  return std::find(kCipherSuites.begin(), kCipherSuites.end(), suite) != kCipherSuites.end();
}

IpmiCredentials parseIpmiCredentials(std::string_view text, const std::string& file) {
  IpmiCredentials credentials;
  bool haveUser = false;
  bool havePassword = false;
  forEachCredentialsLine(text, file, [&](const CredentialsLine& line) {
    if (line.name == "user") {
      if (line.value.size() > kIpmiUserMax) {
        refuseCredentialsFile(
            file, credentialsLineText(line.number) + ": the user name is longer than 16 bytes");
      }
      credentials.user.assign(line.value.data(), line.value.size());
      haveUser = true;
    } else if (line.name == "password") {
      if (line.value.size() > kIpmiPasswordMax) {
        refuseCredentialsFile(
            file, credentialsLineText(line.number) + ": the password is longer than 20 bytes");
      }
      credentials.password.assign(line.value.data(), line.value.size());
      havePassword = true;
    } else if (line.name == "privilege") {
      credentials.privilege = parsePrivilege(line.value, file, line.number);
    } else if (line.name == "cipher-suite") {
      credentials.cipherSuite = parseCipherSuite(line.value, file, line.number);
    } else {
      // The name is not shown: a line with a password where the name belongs (a slip when
      // editing) would otherwise put it in the log.
      refuseCredentialsFile(
          file, credentialsLineText(line.number) +
                    ": unknown name (expected user, password, privilege or cipher-suite)");
    }
  });
  if (!haveUser) {
    refuseCredentialsFile(file, "has no \"user = ...\" line");
  }
  if (!havePassword) {
    refuseCredentialsFile(file, "has no \"password = ...\" line");
  }
  return credentials;
}

IpmiCredentials readIpmiCredentials(const std::string& file, FileSystem& files) {
  IpmiCredentials credentials;
  readCredentialsFile(
      file, files, [&](std::string_view text) { credentials = parseIpmiCredentials(text, file); });
  return credentials;
}

IpmiCredentials readIpmiCredentials(const std::string& file) {
  return readIpmiCredentials(file, *systemFileSystem());
}

}  // namespace platform
}  // namespace Kesta
