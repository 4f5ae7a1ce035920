// Small wrappers around the file system calls that the platform layer needs: an owning file
// descriptor and whole-file reads that refuse anything that could block or never end. The reads
// go through a FileSystem (os/FileSystem.h), the real one unless the caller names another.
#ifndef KESTA_PLATFORM_OS_FILEIO_H
#define KESTA_PLATFORM_OS_FILEIO_H

#include <sys/stat.h>

#include <cstddef>
#include <string>

#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

// Owns one file descriptor and closes it when it goes.
class UniqueFd {
 public:
  constexpr UniqueFd() noexcept = default;
  explicit UniqueFd(int fd) noexcept : fd_(fd) {}
  UniqueFd(UniqueFd&& other) noexcept : fd_(other.release()) {}
  UniqueFd& operator=(UniqueFd&& other) noexcept {
    reset(other.release());
    return *this;
  }
  UniqueFd(const UniqueFd&) = delete;
  UniqueFd& operator=(const UniqueFd&) = delete;
  ~UniqueFd() { reset(); }

  int get() const noexcept { return fd_; }
  explicit operator bool() const noexcept { return fd_ >= 0; }
  // Gives up ownership without closing.
  int release() noexcept {
    const int fd = fd_;
    fd_ = -1;
    return fd;
  }
  // Closes the held descriptor (if any) and takes `fd` instead.
  void reset(int fd = -1) noexcept;

 private:
  int fd_ = -1;
};

// The outcome of reading a whole file: either its bytes, or the errno-style code and a readable
// reason.
struct ReadResult {
  int error = 0;          // 0 on success, else an errno value
  std::string reason;     // why it failed, in words; empty on success
  std::string data;       // the bytes read
  struct stat info = {};  // the file's status as seen through the open descriptor

  bool ok() const { return error == 0; }
};

// Reads the whole regular file at `path` through `files` (relative paths are taken from `dirFd`,
// a directory descriptor of `files` or kWorkingDirectory). Directories, FIFOs, devices and
// sockets are refused, because reading them can block for ever or never end; so are files larger
// than `limit` bytes. The length reported by stat is only a hint: sysfs attributes report 4096
// whatever they hold, so the file is read to its end.
ReadResult readRegularFile(FileSystem& files, int dirFd, const std::string& path,
                           std::size_t limit);
ReadResult readRegularFile(FileSystem& files, const std::string& path, std::size_t limit);
// The same through the real file system (`dirFd` a real descriptor or AT_FDCWD).
ReadResult readRegularFile(int dirFd, const std::string& path, std::size_t limit);
ReadResult readRegularFile(const std::string& path, std::size_t limit);

// Writes all of `size` bytes, going on after short writes and interruptions. False on error.
bool writeAll(int fd, const char* data, std::size_t size) noexcept;

// The text of an errno value (thread-safe, unlike strerror).
std::string errorText(int error);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_OS_FILEIO_H
