#include "instrumentation/ipmi/IpmiCredentials.h"

#include <string.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>

#include "instrumentation/SourceError.h"
#include "os/FileIo.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

// A credentials file is a handful of short lines; anything bigger is the wrong file.
constexpr std::size_t kCredentialsFileLimit = 4096;

constexpr std::array<unsigned int, 8> kCipherSuites = {1, 2, 3, 6, 7, 8, 11, 12};

// Wipes a buffer of raw file bytes when it goes.
template <std::size_t Size>
struct WipedBuffer {
  std::array<char, Size> bytes = {};
  ~WipedBuffer() { ::explicit_bzero(bytes.data(), bytes.size()); }
};

std::string_view trimmed(std::string_view text) {
  const std::string_view::size_type first = text.find_first_not_of(" \t");
  if (first == std::string_view::npos) {
    return {};
  }
  const std::string_view::size_type last = text.find_last_not_of(" \t");
  return text.substr(first, last - first + 1);
}

std::string modeText(mode_t mode) {
  char text[8] = {};
  std::snprintf(text, sizeof text, "%04o", static_cast<unsigned int>(mode & 07777));
  return text;
}

[[noreturn]] void refuse(const std::string& file, const std::string& why) {
  throw SourceError("credentials file \"" + printable(file) + "\" " + why);
}

std::string lineText(std::size_t line) { return "line " + std::to_string(line); }

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
  refuse(file, lineText(line) + ": privilege must be user, operator or administrator");
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
    refuse(file, lineText(line) +
                     ": cipher-suite must be one of 1, 2, 3, 6, 7, 8, 11 or 12 (3 is the usual "
                     "choice; 0 would send no authentication and is refused)");
  }
  return suite;
}

}  // namespace

void wipe(std::string& text) noexcept {
  if (!text.empty()) {
    ::explicit_bzero(text.data(), text.size());
  }
  text.clear();
}

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
  bool havePrivilege = false;
  bool haveCipherSuite = false;

  std::size_t number = 0;
  while (!text.empty()) {
    ++number;
    const std::string_view::size_type end = text.find('\n');
    std::string_view line = text.substr(0, end);
    text = end == std::string_view::npos ? std::string_view() : text.substr(end + 1);
    if (!line.empty() && line.back() == '\r') {
      line.remove_suffix(1);
    }
    line = trimmed(line);
    if (line.empty() || line.front() == '#') {
      continue;
    }
    const std::string_view::size_type equals = line.find('=');
    if (equals == std::string_view::npos) {
      refuse(file, lineText(number) + " is not \"name = value\"");
    }
    const std::string name = asciiLowerCopy(trimmed(line.substr(0, equals)));
    const std::string_view value = trimmed(line.substr(equals + 1));
    if (value.find('\0') != std::string_view::npos) {
      refuse(file, lineText(number) + ": the value holds a NUL character");
    }

    const auto once = [&](bool& seen) {
      if (seen) {
        refuse(file, lineText(number) + ": \"" + name + "\" is given twice");
      }
      seen = true;
    };
    if (name == "user") {
      once(haveUser);
      if (value.size() > kIpmiUserMax) {
        refuse(file, lineText(number) + ": the user name is longer than 16 bytes");
      }
      credentials.user.assign(value.data(), value.size());
    } else if (name == "password") {
      once(havePassword);
      if (value.size() > kIpmiPasswordMax) {
        refuse(file, lineText(number) + ": the password is longer than 20 bytes");
      }
      credentials.password.assign(value.data(), value.size());
    } else if (name == "privilege") {
      once(havePrivilege);
      credentials.privilege = parsePrivilege(value, file, number);
    } else if (name == "cipher-suite") {
      once(haveCipherSuite);
      credentials.cipherSuite = parseCipherSuite(value, file, number);
    } else {
      // The name is not shown: a line with a password where the name belongs (a slip when
      // editing) would otherwise put it in the log.
      refuse(file, lineText(number) +
                       ": unknown name (expected user, password, privilege or cipher-suite)");
    }
  }
  if (!haveUser) {
    refuse(file, "has no \"user = ...\" line");
  }
  if (!havePassword) {
    refuse(file, "has no \"password = ...\" line");
  }
  return credentials;
}

std::string credentialsFileProblem(const struct stat& info, uid_t user) {
  if (!S_ISREG(info.st_mode)) {
    return "is not a regular file";
  }
  if (info.st_uid != user && info.st_uid != 0) {
    return "belongs to user " + std::to_string(info.st_uid) + ", not to " + std::to_string(user) +
           " (the user the provider runs as) or root";
  }
  if ((info.st_mode & (S_IRWXG | S_IRWXO)) != 0) {
    return "has mode " + modeText(info.st_mode) +
           ", which lets others read or change it; allow its owner only (chmod 600)";
  }
  return std::string();
}

IpmiCredentials readIpmiCredentials(const std::string& file, FileSystem& files) {
  if (file.empty() || file.front() != '/') {
    refuse(file, "is not an absolute path");
  }
  const int opened = files.openForReading(kWorkingDirectory, file);
  if (opened < 0) {
    refuse(file, "cannot be opened: " + errorText(-opened));
  }
  const FileSystemFd fd(files, opened);
  struct stat info = {};
  if (const int examined = files.fstat(fd.get(), info); examined < 0) {
    refuse(file, "cannot be examined: " + errorText(-examined));
  }
  if (std::string problem = credentialsFileProblem(info, ::geteuid()); !problem.empty()) {
    refuse(file, problem);
  }

  WipedBuffer<kCredentialsFileLimit + 1> buffer;
  std::size_t used = 0;
  while (used < buffer.bytes.size()) {
    const long got = files.read(fd.get(), buffer.bytes.data() + used, buffer.bytes.size() - used);
    if (got < 0) {
      if (got == -EINTR) {
        continue;
      }
      refuse(file, "cannot be read: " + errorText(static_cast<int>(-got)));
    }
    if (got == 0) {
      break;
    }
    used += static_cast<std::size_t>(got);
  }
  if (used > kCredentialsFileLimit) {
    refuse(file, "is larger than " + std::to_string(kCredentialsFileLimit) + " bytes");
  }
  return parseIpmiCredentials(std::string_view(buffer.bytes.data(), used), file);
}

IpmiCredentials readIpmiCredentials(const std::string& file) {
  return readIpmiCredentials(file, *systemFileSystem());
}

}  // namespace platform
}  // namespace Kesta
