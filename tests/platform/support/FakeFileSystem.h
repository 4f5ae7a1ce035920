// A FileSystem for tests: an in-memory tree, or the real file system passed through, failing
// where the test says. With it the cases that need a file the process cannot read (EACCES), a
// disk that fails (EIO) or a file that vanishes after it was listed (ENOENT) run everywhere, also
// as root, where a file of mode 0 is readable.
#ifndef BLUELIGHT_TESTS_PLATFORM_FAKEFILESYSTEM_H
#define BLUELIGHT_TESTS_PLATFORM_FAKEFILESYSTEM_H

#include <sys/stat.h>

#include <cstddef>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "os/FileSystem.h"

namespace platform_test {

// Paths are matched by their text: the directory descriptor's path (as it was opened) is put in
// front of a relative path, and "." and ".." are resolved lexically. So a failure set for
// "/t/led/brightness" is met whether the code opens that path or "led/brightness" relative to a
// descriptor of "/t". Symbolic links are not followed for matching.
//
// The in-memory tree starts with "/" alone; adding an entry adds its missing parent folders.
// Its modes and owners are reported, never enforced (failures are set explicitly), and its
// symbolic links are followed as the kernel follows them, at most 40 in one path. Over the real
// file system, relative paths from kWorkingDirectory are taken from the working directory.
//
// Every member may be used from several threads at once.
class FakeFileSystem final : public Kesta::platform::FileSystem {
 public:
  enum class Call { Open, OpenDirectory, Close, Read, Fstat, StatAt, ReadLink, List };
  static constexpr int kEveryTime = -1;

  // An in-memory tree holding only "/".
  FakeFileSystem();
  // The real file system, passed through except where a failure is set.
  static std::shared_ptr<FakeFileSystem> overRealFiles();

  // The in-memory tree (an error to use over the real file system). Adding a file that exists
  // replaces its content and changes its modification time, as a rewrite would.
  void addFile(const std::string& path, const std::string& content, mode_t mode = 0644);
  void addDirectory(const std::string& path, mode_t mode = 0755);
  void addSymlink(const std::string& path, const std::string& target);
  void addFifo(const std::string& path);
  void remove(const std::string& path);

  // `call` on `path` fails with `error` (a positive errno value): every time, or the next
  // `times` times. A failing open or stat opens or finds nothing; a failing close still closes.
  void fail(Call call, const std::string& path, int error, int times = kEveryTime);
  // Changes what fstat and statAt report for `path` (its owner, mode, size, ...).
  void changeStatus(const std::string& path, std::function<void(struct stat&)> change);

  // Every call so far, in order, as "<call> <path>": "open /t/a", "opendir /t", "close /t/a",
  // "read /t/a", "fstat /t/a", "stat /t/a", "readlink /t/a", "list /t".
  std::vector<std::string> calls() const;
  // How many of the calls so far were `call` on `path`.
  std::size_t count(Call call, const std::string& path) const;
  void clearCalls();
  // Descriptors handed out and not closed yet.
  std::size_t openDescriptors() const;
  // Closes of descriptors this file system never handed out (or had closed already).
  std::size_t strayCloses() const;

  int openForReading(int directory, const std::string& path) override;
  int openDirectory(int directory, const std::string& path) override;
  int close(int fd) override;
  long read(int fd, char* buffer, std::size_t size) override;
  int fstat(int fd, struct stat& info) override;
  int statAt(int directory, const std::string& path, struct stat& info) override;
  int readLinkAt(int directory, const std::string& path, std::string& target) override;
  int listDirectory(int fd, std::vector<std::string>& names) override;

 private:
  enum class Kind { File, Directory, Symlink, Fifo };
  struct Entry {
    Kind kind = Kind::File;
    std::string content;  // a file's bytes, a link's target
    mode_t mode = 0;
    uid_t owner = 0;
    ino_t inode = 0;
    long version = 0;  // the modification time's nanoseconds: changes with every rewrite
  };
  struct Open {
    std::string name;      // the path the descriptor was opened by (for matching)
    std::string resolved;  // in memory: the entry it stands for
    std::size_t offset = 0;
  };
  struct Failure {
    Call call;
    std::string path;
    int error;
    int times;
  };

  explicit FakeFileSystem(bool real);

  // Everything below is called with mutex_ held.
  std::string nameOf(int directory, const std::string& path, int& error) const;
  int failure(Call call, const std::string& name);
  void record(Call call, const std::string& name);
  void applyChanges(const std::string& name, struct stat& info) const;
  // The in-memory entry that `name` leads to, following links (the last one only when
  // `followLast`); "" with `error` set when there is none.
  std::string resolve(const std::string& name, bool followLast, int& error) const;
  void addEntry(const std::string& path, Entry entry);
  struct stat statusOf(const Entry& entry) const;
  int handOut(Open open);
  // What every call on a path does first: the name it stands for, the record of the call, and
  // an injected failure. 0 to go on, else minus the error.
  int begin(Call call, int directory, const std::string& path, std::string& name);
  // The same for a call on a descriptor: its open file, or null with `result` set to minus the
  // error (EBADF for a descriptor that is not open).
  Open* begin(Call call, int fd, int& result);
  // Opens a file (Call::Open) or a directory (Call::OpenDirectory); the one member that takes
  // mutex_ itself.
  int openEntry(Call call, int directory, const std::string& path);

  const bool real_;
  mutable std::mutex mutex_;
  std::map<std::string, Entry> entries_;
  std::map<int, Open> open_;
  std::vector<Failure> failures_;
  std::vector<std::pair<std::string, std::function<void(struct stat&)>>> changes_;
  std::vector<std::string> calls_;
  std::size_t strayCloses_ = 0;
  int nextFd_ = 1000;
  ino_t nextInode_ = 2;
};

}  // namespace platform_test

#endif  // BLUELIGHT_TESTS_PLATFORM_FAKEFILESYSTEM_H
