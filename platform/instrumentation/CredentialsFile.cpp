#include "instrumentation/CredentialsFile.h"

#include <string.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstdio>
#include <set>

#include "instrumentation/SourceError.h"
#include "os/FileIo.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

// Wipes a buffer of raw file bytes when it goes.
template <std::size_t Size>
struct WipedBuffer {
  std::array<char, Size> bytes = {};
  WipedBuffer() = default;
  WipedBuffer(const WipedBuffer&) = delete;
  WipedBuffer& operator=(const WipedBuffer&) = delete;
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

}  // namespace

void wipe(std::string& text) noexcept {
  if (!text.empty()) {
    ::explicit_bzero(text.data(), text.size());
  }
  text.clear();
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

void refuseCredentialsFile(const std::string& file, const std::string& why) {
  throw SourceError("credentials file \"" + printable(file) + "\" " + why);
}

std::string credentialsLineText(std::size_t number) { return "line " + std::to_string(number); }

void forEachCredentialsLine(std::string_view text, const std::string& file,
                            const std::function<void(const CredentialsLine&)>& take) {
  // Only names that `take` accepted get here twice: it refuses an unknown name the first time.
  std::set<std::string> seen;
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
      refuseCredentialsFile(file, credentialsLineText(number) + " is not \"name = value\"");
    }
    CredentialsLine entry;
    entry.number = number;
    entry.name = asciiLowerCopy(trimmed(line.substr(0, equals)));
    entry.value = trimmed(line.substr(equals + 1));
    if (entry.value.find('\0') != std::string_view::npos) {
      refuseCredentialsFile(file,
                            credentialsLineText(number) + ": the value holds a NUL character");
    }
    if (seen.count(entry.name) != 0) {
      refuseCredentialsFile(
          file, credentialsLineText(number) + ": \"" + entry.name + "\" is given twice");
    }
    take(entry);
    seen.insert(entry.name);
  }
}

void readCredentialsFile(const std::string& file, FileSystem& files,
                         const std::function<void(std::string_view)>& parse) {
  if (file.empty() || file.front() != '/') {
    refuseCredentialsFile(file, "is not an absolute path");
  }
  const int opened = files.openForReading(kWorkingDirectory, file);
  if (opened < 0) {
    refuseCredentialsFile(file, "cannot be opened: " + errorText(-opened));
  }
  const FileSystemFd fd(files, opened);
  struct stat info = {};
  if (const int examined = files.fstat(fd.get(), info); examined < 0) {
    refuseCredentialsFile(file, "cannot be examined: " + errorText(-examined));
  }
  if (std::string problem = credentialsFileProblem(info, ::geteuid()); !problem.empty()) {
    refuseCredentialsFile(file, problem);
  }

  WipedBuffer<kCredentialsFileLimit + 1> buffer;
  std::size_t used = 0;
  while (used < buffer.bytes.size()) {
    const long got = files.read(fd.get(), buffer.bytes.data() + used, buffer.bytes.size() - used);
    if (got < 0) {
      if (got == -EINTR) {
        continue;
      }
      refuseCredentialsFile(file, "cannot be read: " + errorText(static_cast<int>(-got)));
    }
    if (got == 0) {
      break;
    }
    used += static_cast<std::size_t>(got);
  }
  if (used > kCredentialsFileLimit) {
    refuseCredentialsFile(file,
                          "is larger than " + std::to_string(kCredentialsFileLimit) + " bytes");
  }
  parse(std::string_view(buffer.bytes.data(), used));
}

}  // namespace platform
}  // namespace Kesta
