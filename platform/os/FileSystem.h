// The file system as the platform reads it, behind an interface.
//
// Why this seam exists: the sources must cope with files that cannot be read - no permission,
// an I/O error, an attribute that vanishes between listing and reading, a link that dangles -
// and the tests must show that they do. A process running as root reads every file whatever its
// mode, and real I/O errors cannot be made on demand at all, so tests that went through the real
// file system could only skip those cases where it mattered most (CI runs as root). Every reader
// of files in the platform therefore takes a FileSystem by injection, with systemFileSystem() as
// the default, and tests hand in one that fails where they say (tests/platform/support/
// FakeFileSystem.h).
//
// The calls are the system calls the readers make and nothing more. Each returns what the system
// call returns on success and the negated errno value on failure (-ENOENT, -EACCES, ...), as
// IpmiDeviceOs does, so no errno is carried between calls. A descriptor belongs to the file
// system that opened it: only that one reads, examines or closes it (FileSystemFd does the
// closing). A relative path is taken from the directory descriptor passed with it, as openat(2)
// does; kWorkingDirectory stands for the process's working directory.
#ifndef KESTA_PLATFORM_OS_FILESYSTEM_H
#define KESTA_PLATFORM_OS_FILESYSTEM_H

#include <fcntl.h>
#include <sys/stat.h>

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

namespace Kesta {
namespace platform {

constexpr int kWorkingDirectory = AT_FDCWD;

class FileSystem {
 public:
  FileSystem() = default;
  virtual ~FileSystem();
  FileSystem(const FileSystem&) = delete;
  FileSystem& operator=(const FileSystem&) = delete;

  // Opens `path` for reading. Opening never waits: a FIFO without a writer opens at once
  // (O_NONBLOCK), so that the caller can look at the type of what it opened before reading.
  virtual int openForReading(int directory, const std::string& path) = 0;
  // Opens the directory at `path`, to list it and to name files relative to it; -ENOTDIR when
  // `path` is something else.
  virtual int openDirectory(int directory, const std::string& path) = 0;
  virtual int close(int fd) = 0;
  // Reads up to `size` bytes: the count read, 0 at the end. May fail with -EINTR, which the
  // caller repeats.
  virtual long read(int fd, char* buffer, std::size_t size) = 0;
  // The status of an open file (fstat).
  virtual int fstat(int fd, struct stat& info) = 0;
  // The status of what `path` names, following symbolic links: a dangling link is -ENOENT.
  virtual int statAt(int directory, const std::string& path, struct stat& info) = 0;
  // The text of the symbolic link at `path` as it was written, not followed (so a dangling link
  // has one too); -EINVAL when `path` is not a link.
  virtual int readLinkAt(int directory, const std::string& path, std::string& target) = 0;
  // The names in the directory open as `fd`, without "." and "..", in the file system's order.
  // Each listing starts at the beginning; one descriptor is listed by one thread at a time.
  virtual int listDirectory(int fd, std::vector<std::string>& names) = 0;
};

// The real file system. Stateless, so one instance serves the whole process.
std::shared_ptr<FileSystem> systemFileSystem();

// Owns one descriptor of a FileSystem and closes it through that file system when it goes. The
// file system must outlive it.
class FileSystemFd {
 public:
  FileSystemFd() noexcept = default;
  // Takes `fd` when it is a descriptor; a negative value (a failed open) is held as none.
  FileSystemFd(FileSystem& files, int fd) noexcept : files_(&files), fd_(fd < 0 ? -1 : fd) {}
  FileSystemFd(FileSystemFd&& other) noexcept : files_(other.files_), fd_(other.fd_) {
    other.fd_ = -1;
  }
  FileSystemFd& operator=(FileSystemFd&& other) noexcept;
  FileSystemFd(const FileSystemFd&) = delete;
  FileSystemFd& operator=(const FileSystemFd&) = delete;
  ~FileSystemFd() { reset(); }

  int get() const noexcept { return fd_; }
  explicit operator bool() const noexcept { return fd_ >= 0; }
  // Closes the held descriptor, if any.
  void reset() noexcept;

 private:
  FileSystem* files_ = nullptr;
  int fd_ = -1;
};

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_OS_FILESYSTEM_H
