#include "os/FileSystem.h"

#include <dirent.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <memory>

namespace Kesta {
namespace platform {

namespace {

struct DirCloser {
  void operator()(DIR* directory) const { ::closedir(directory); }
};
using DirHandle = std::unique_ptr<DIR, DirCloser>;

class SystemFileSystem final : public FileSystem {
 public:
  int openForReading(int directory, const std::string& path) override {
    const int fd = ::openat(directory, path.c_str(), O_RDONLY | O_CLOEXEC | O_NOCTTY | O_NONBLOCK);
    return fd >= 0 ? fd : -errno;
  }

  int openDirectory(int directory, const std::string& path) override {
    const int fd = ::openat(directory, path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    return fd >= 0 ? fd : -errno;
  }

  // On Linux the descriptor is gone even when close reports EINTR, so it is never retried.
  int close(int fd) override { return ::close(fd) == 0 ? 0 : -errno; }

  long read(int fd, char* buffer, std::size_t size) override {
    const ssize_t got = ::read(fd, buffer, size);
    return got >= 0 ? static_cast<long>(got) : -errno;
  }

  int fstat(int fd, struct stat& info) override { return ::fstat(fd, &info) == 0 ? 0 : -errno; }

  int statAt(int directory, const std::string& path, struct stat& info) override {
    return ::fstatat(directory, path.c_str(), &info, 0) == 0 ? 0 : -errno;
  }

  int readLinkAt(int directory, const std::string& path, std::string& target) override {
    // A link's text is at most PATH_MAX bytes; one byte more shows that nothing was cut off.
    std::string text(PATH_MAX + 1, '\0');
    const ssize_t length = ::readlinkat(directory, path.c_str(), text.data(), text.size());
    if (length < 0) {
      return -errno;
    }
    if (static_cast<std::size_t>(length) == text.size()) {
      return -ENAMETOOLONG;
    }
    text.resize(static_cast<std::size_t>(length));
    target = std::move(text);
    return 0;
  }

  int listDirectory(int fd, std::vector<std::string>& names) override {
    // closedir closes the descriptor it was given, so it gets a copy; the copy shares the
    // position in the directory with `fd`, hence the rewind.
    const int copy = ::fcntl(fd, F_DUPFD_CLOEXEC, 0);
    if (copy < 0) {
      return -errno;
    }
    const DirHandle directory(::fdopendir(copy));
    if (directory == nullptr) {
      const int error = errno;
      ::close(copy);
      return -error;
    }
    ::rewinddir(directory.get());
    std::vector<std::string> found;
    for (;;) {
      // readdir reports an error only through errno, so it is cleared before every call.
      errno = 0;
      const dirent* entry = ::readdir(directory.get());
      if (entry == nullptr) {
        if (errno != 0) {
          return -errno;
        }
        break;
      }
      const std::string name = entry->d_name;
      if (name != "." && name != "..") {
        found.push_back(name);
      }
    }
    names = std::move(found);
    return 0;
  }
};

}  // namespace

FileSystem::~FileSystem() = default;

std::shared_ptr<FileSystem> systemFileSystem() {
  static const std::shared_ptr<FileSystem> files = std::make_shared<SystemFileSystem>();
  return files;
}

FileSystemFd& FileSystemFd::operator=(FileSystemFd&& other) noexcept {
  if (this != &other) {
    reset();
    files_ = other.files_;
    fd_ = other.fd_;
    other.fd_ = -1;
  }
  return *this;
}

void FileSystemFd::reset() noexcept {
  if (fd_ >= 0 && files_ != nullptr) {
    files_->close(fd_);
  }
  fd_ = -1;
}

}  // namespace platform
}  // namespace Kesta
