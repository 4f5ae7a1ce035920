#include "os/FileIo.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

namespace Kesta {
namespace platform {

void UniqueFd::reset(int fd) noexcept {
  if (fd_ >= 0) {
    // On Linux the descriptor is gone even when close reports EINTR, so it is never retried.
    ::close(fd_);
  }
  fd_ = fd;
}

namespace {

ReadResult failure(int error, std::string reason) {
  ReadResult result;
  result.error = error;
  result.reason = std::move(reason);
  return result;
}

}  // namespace

std::string errorText(int error) {
  char buffer[256] = {};
  // The GNU strerror_r may return a static string instead of filling the buffer.
  const char* text = ::strerror_r(error, buffer, sizeof buffer);
  return text != nullptr ? std::string(text) : "error " + std::to_string(error);
}

ReadResult readRegularFile(FileSystem& files, int dirFd, const std::string& path,
                           std::size_t limit) {
  // Opening never waits for a writer when the path is a FIFO; the file type is checked right
  // after.
  const int opened = files.openForReading(dirFd, path);
  if (opened < 0) {
    return failure(-opened, errorText(-opened));
  }
  const FileSystemFd fd(files, opened);
  struct stat info = {};
  if (const int examined = files.fstat(fd.get(), info); examined < 0) {
    return failure(-examined, errorText(-examined));
  }
  if (S_ISDIR(info.st_mode)) {
    return failure(EISDIR, "it is a directory");
  }
  if (!S_ISREG(info.st_mode)) {
    return failure(EINVAL, "it is not a regular file");
  }
  if (static_cast<unsigned long long>(info.st_size) > limit) {
    return failure(EFBIG, "it is larger than " + std::to_string(limit) + " bytes");
  }

  // The buffer never grows past limit + 1 bytes: filling that last byte proves the file is too
  // large without reading any more of it.
  const std::size_t cap = limit + 1;
  ReadResult result;
  result.info = info;
  result.data.resize(std::min<std::size_t>(static_cast<std::size_t>(info.st_size) + 1, cap));
  std::size_t used = 0;
  for (;;) {
    if (used == result.data.size()) {
      if (used == cap) {
        return failure(EFBIG, "it is larger than " + std::to_string(limit) + " bytes");
      }
      result.data.resize(std::min<std::size_t>(std::max<std::size_t>(used * 2, 4096), cap));
    }
    const long got = files.read(fd.get(), &result.data[used], result.data.size() - used);
    if (got < 0) {
      if (got == -EINTR) {
        continue;
      }
      return failure(static_cast<int>(-got), errorText(static_cast<int>(-got)));
    }
    if (got == 0) {
      break;
    }
    used += static_cast<std::size_t>(got);
  }
  result.data.resize(used);
  return result;
}

ReadResult readRegularFile(FileSystem& files, const std::string& path, std::size_t limit) {
  return readRegularFile(files, kWorkingDirectory, path, limit);
}

ReadResult readRegularFile(int dirFd, const std::string& path, std::size_t limit) {
  return readRegularFile(*systemFileSystem(), dirFd, path, limit);
}

ReadResult readRegularFile(const std::string& path, std::size_t limit) {
  return readRegularFile(*systemFileSystem(), kWorkingDirectory, path, limit);
}

bool writeAll(int fd, const char* data, std::size_t size) noexcept {
  while (size > 0) {
    const ssize_t written = ::write(fd, data, size);
    if (written < 0) {
      if (errno == EINTR) {
        continue;
      }
      return false;
    }
    data += written;
    size -= static_cast<std::size_t>(written);
  }
  return true;
}

}  // namespace platform
}  // namespace Kesta
