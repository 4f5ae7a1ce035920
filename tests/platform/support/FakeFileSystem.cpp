#include "FakeFileSystem.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <stdexcept>

namespace platform_test {

namespace {

using Kesta::platform::kWorkingDirectory;
using Kesta::platform::systemFileSystem;

constexpr int kMostLinksInOnePath = 40;  // as the kernel allows

// The lexical form every path is compared in: "." and ".." resolved, no trailing '/'.
std::string normal(const std::filesystem::path& path) {
  std::string text = path.lexically_normal().string();
  while (text.size() > 1 && text.back() == '/') {
    text.pop_back();
  }
  return text;
}

std::vector<std::string> components(const std::string& path) {
  std::vector<std::string> parts;
  for (const std::filesystem::path& part : std::filesystem::path(path).relative_path()) {
    if (!part.empty()) {
      parts.push_back(part.string());
    }
  }
  return parts;
}

const char* callName(FakeFileSystem::Call call) {
  switch (call) {
    case FakeFileSystem::Call::Open:
      return "open";
    case FakeFileSystem::Call::OpenDirectory:
      return "opendir";
    case FakeFileSystem::Call::Close:
      return "close";
    case FakeFileSystem::Call::Read:
      return "read";
    case FakeFileSystem::Call::Fstat:
      return "fstat";
    case FakeFileSystem::Call::StatAt:
      return "stat";
    case FakeFileSystem::Call::ReadLink:
      return "readlink";
    case FakeFileSystem::Call::List:
      return "list";
  }
  return "?";
}

}  // namespace

FakeFileSystem::FakeFileSystem() : FakeFileSystem(false) {}

FakeFileSystem::FakeFileSystem(bool real) : real_(real) {
  if (!real_) {
    Entry root;
    root.kind = Kind::Directory;
    root.mode = 0755;
    root.owner = ::geteuid();
    root.inode = nextInode_++;
    entries_.emplace("/", root);
  }
}

std::shared_ptr<FakeFileSystem> FakeFileSystem::overRealFiles() {
  return std::shared_ptr<FakeFileSystem>(new FakeFileSystem(true));
}

void FakeFileSystem::addFile(const std::string& path, const std::string& content, mode_t mode) {
  Entry entry;
  entry.kind = Kind::File;
  entry.content = content;
  entry.mode = mode;
  addEntry(path, std::move(entry));
}

void FakeFileSystem::addDirectory(const std::string& path, mode_t mode) {
  Entry entry;
  entry.kind = Kind::Directory;
  entry.mode = mode;
  addEntry(path, std::move(entry));
}

void FakeFileSystem::addSymlink(const std::string& path, const std::string& target) {
  Entry entry;
  entry.kind = Kind::Symlink;
  entry.content = target;
  entry.mode = 0777;
  addEntry(path, std::move(entry));
}

void FakeFileSystem::addFifo(const std::string& path) {
  Entry entry;
  entry.kind = Kind::Fifo;
  entry.mode = 0600;
  addEntry(path, std::move(entry));
}

void FakeFileSystem::remove(const std::string& path) {
  std::lock_guard<std::mutex> lock(mutex_);
  const std::string name = normal(path);
  const std::string below = name == "/" ? "/" : name + "/";
  for (auto entry = entries_.begin(); entry != entries_.end();) {
    if (entry->first == name || entry->first.rfind(below, 0) == 0) {
      entry = entries_.erase(entry);
    } else {
      ++entry;
    }
  }
}

void FakeFileSystem::addEntry(const std::string& path, Entry entry) {
  if (real_ || path.empty() || path.front() != '/') {
    throw std::logic_error("the in-memory tree takes absolute paths only: " + path);
  }
  std::lock_guard<std::mutex> lock(mutex_);
  const std::string name = normal(path);
  std::string parent;
  for (const std::string& part : components(name)) {
    if (!parent.empty() && parent != name) {
      Entry& folder = entries_[parent];
      if (folder.inode == 0) {
        folder.kind = Kind::Directory;
        folder.mode = 0755;
        folder.owner = ::geteuid();
        folder.inode = nextInode_++;
      }
    }
    parent += "/";
    parent += part;
  }
  entry.owner = ::geteuid();
  const auto existing = entries_.find(name);
  if (existing != entries_.end() && existing->second.kind == entry.kind) {
    entry.inode = existing->second.inode;
    entry.version = existing->second.version + 1;
  } else {
    entry.inode = nextInode_++;
  }
  entries_[name] = std::move(entry);
}

void FakeFileSystem::fail(Call call, const std::string& path, int error, int times) {
  std::lock_guard<std::mutex> lock(mutex_);
  failures_.push_back({call, normal(path), error, times});
}

void FakeFileSystem::changeStatus(const std::string& path,
                                  std::function<void(struct stat&)> change) {
  std::lock_guard<std::mutex> lock(mutex_);
  changes_.emplace_back(normal(path), std::move(change));
}

std::vector<std::string> FakeFileSystem::calls() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return calls_;
}

std::size_t FakeFileSystem::count(Call call, const std::string& path) const {
  std::lock_guard<std::mutex> lock(mutex_);
  const std::string wanted = std::string(callName(call)) + " " + normal(path);
  return static_cast<std::size_t>(std::count(calls_.begin(), calls_.end(), wanted));
}

void FakeFileSystem::clearCalls() {
  std::lock_guard<std::mutex> lock(mutex_);
  calls_.clear();
}

std::size_t FakeFileSystem::openDescriptors() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return open_.size();
}

std::size_t FakeFileSystem::strayCloses() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return strayCloses_;
}

std::string FakeFileSystem::nameOf(int directory, const std::string& path, int& error) const {
  if (path.empty()) {
    error = ENOENT;
    return path;
  }
  std::filesystem::path base;
  if (path.front() != '/') {
    if (directory == kWorkingDirectory) {
      base = real_ ? std::filesystem::current_path() : std::filesystem::path("/");
    } else {
      const auto found = open_.find(directory);
      if (found == open_.end()) {
        error = EBADF;
        return path;
      }
      base = found->second.name;
    }
  }
  return normal(base / path);
}

int FakeFileSystem::failure(Call call, const std::string& name) {
  for (auto planned = failures_.begin(); planned != failures_.end(); ++planned) {
    if (planned->call != call || planned->path != name) {
      continue;
    }
    const int error = planned->error;
    if (planned->times > 0 && --planned->times == 0) {
      failures_.erase(planned);
    }
    return error;
  }
  return 0;
}

void FakeFileSystem::record(Call call, const std::string& name) {
  calls_.push_back(std::string(callName(call)) + " " + name);
}

void FakeFileSystem::applyChanges(const std::string& name, struct stat& info) const {
  for (const auto& change : changes_) {
    if (change.first == name) {
      change.second(info);
    }
  }
}

std::string FakeFileSystem::resolve(const std::string& name, bool followLast, int& error) const {
  std::string path = name;
  int links = 0;
  for (;;) {
    const std::vector<std::string> parts = components(path);
    std::string current = "/";
    bool restarted = false;
    for (std::size_t i = 0; i < parts.size() && !restarted; ++i) {
      const std::string next = current == "/" ? "/" + parts[i] : current + "/" + parts[i];
      const auto found = entries_.find(next);
      if (found == entries_.end()) {
        error = ENOENT;
        return std::string();
      }
      const bool last = i + 1 == parts.size();
      if (found->second.kind == Kind::Symlink && (!last || followLast)) {
        if (++links > kMostLinksInOnePath) {
          error = ELOOP;
          return std::string();
        }
        const std::filesystem::path target(found->second.content);
        std::filesystem::path rest;
        for (std::size_t j = i + 1; j < parts.size(); ++j) {
          rest /= parts[j];
        }
        path = normal((target.is_absolute() ? target : std::filesystem::path(current) / target) /
                      rest);
        restarted = true;
        continue;
      }
      if (!last && found->second.kind != Kind::Directory) {
        error = ENOTDIR;
        return std::string();
      }
      current = next;
    }
    if (!restarted) {
      return current;
    }
  }
}

struct stat FakeFileSystem::statusOf(const Entry& entry) const {
  struct stat info = {};
  info.st_dev = 0xfa4e;
  info.st_ino = entry.inode;
  info.st_nlink = 1;
  info.st_uid = entry.owner;
  info.st_blksize = 4096;
  info.st_mtim.tv_sec = 1700000000;
  info.st_mtim.tv_nsec = entry.version;
  switch (entry.kind) {
    case Kind::File:
      info.st_mode = S_IFREG | entry.mode;
      info.st_size = static_cast<off_t>(entry.content.size());
      break;
    case Kind::Directory:
      info.st_mode = S_IFDIR | entry.mode;
      info.st_size = 4096;
      break;
    case Kind::Symlink:
      info.st_mode = S_IFLNK | entry.mode;
      info.st_size = static_cast<off_t>(entry.content.size());
      break;
    case Kind::Fifo:
      info.st_mode = S_IFIFO | entry.mode;
      break;
  }
  return info;
}

int FakeFileSystem::handOut(Open open) {
  const int fd = nextFd_++;
  open_.emplace(fd, std::move(open));
  return fd;
}

int FakeFileSystem::begin(Call call, int directory, const std::string& path, std::string& name) {
  int error = 0;
  name = nameOf(directory, path, error);
  record(call, name);
  if (error == 0) {
    error = failure(call, name);
  }
  return -error;
}

FakeFileSystem::Open* FakeFileSystem::begin(Call call, int fd, int& result) {
  const auto found = open_.find(fd);
  if (found == open_.end()) {
    result = -EBADF;
    return nullptr;
  }
  record(call, found->second.name);
  result = -failure(call, found->second.name);
  return result == 0 ? &found->second : nullptr;
}

int FakeFileSystem::openEntry(Call call, int directory, const std::string& path) {
  std::lock_guard<std::mutex> lock(mutex_);
  std::string name;
  if (const int result = begin(call, directory, path, name); result != 0) {
    return result;
  }
  if (real_) {
    const std::shared_ptr<FileSystem> system = systemFileSystem();
    const int fd = call == Call::OpenDirectory ? system->openDirectory(directory, path)
                                               : system->openForReading(directory, path);
    if (fd >= 0) {
      open_.emplace(fd, Open{name, std::string(), 0});
    }
    return fd;
  }
  int error = 0;
  const std::string resolved = resolve(name, true, error);
  if (resolved.empty()) {
    return -error;
  }
  if (call == Call::OpenDirectory && entries_.at(resolved).kind != Kind::Directory) {
    return -ENOTDIR;
  }
  return handOut(Open{name, resolved, 0});
}

int FakeFileSystem::openForReading(int directory, const std::string& path) {
  return openEntry(Call::Open, directory, path);
}

int FakeFileSystem::openDirectory(int directory, const std::string& path) {
  return openEntry(Call::OpenDirectory, directory, path);
}

int FakeFileSystem::close(int fd) {
  std::lock_guard<std::mutex> lock(mutex_);
  const auto found = open_.find(fd);
  if (found == open_.end()) {
    ++strayCloses_;
    calls_.push_back("close ?" + std::to_string(fd));
    return -EBADF;
  }
  const std::string name = found->second.name;
  open_.erase(found);
  record(Call::Close, name);
  const int error = failure(Call::Close, name);
  const int closed = real_ ? systemFileSystem()->close(fd) : 0;
  return error != 0 ? -error : closed;
}

long FakeFileSystem::read(int fd, char* buffer, std::size_t size) {
  std::lock_guard<std::mutex> lock(mutex_);
  int result = 0;
  Open* const opened = begin(Call::Read, fd, result);
  if (opened == nullptr) {
    return result;
  }
  Open& open = *opened;
  if (real_) {
    return systemFileSystem()->read(fd, buffer, size);
  }
  const auto entry = entries_.find(open.resolved);
  if (entry == entries_.end()) {
    return 0;  // removed while open: nothing more to read
  }
  if (entry->second.kind == Kind::Directory) {
    return -EISDIR;
  }
  if (entry->second.kind == Kind::Fifo) {
    return -EAGAIN;  // opened without waiting, and no writer ever comes
  }
  const std::string& content = entry->second.content;
  const std::size_t from = std::min(open.offset, content.size());
  const std::size_t length = std::min(size, content.size() - from);
  std::copy_n(content.data() + from, length, buffer);
  open.offset = from + length;
  return static_cast<long>(length);
}

int FakeFileSystem::fstat(int fd, struct stat& info) {
  std::lock_guard<std::mutex> lock(mutex_);
  int result = 0;
  const Open* const opened = begin(Call::Fstat, fd, result);
  if (opened == nullptr) {
    return result;
  }
  const Open& open = *opened;
  if (real_) {
    if (const int result = systemFileSystem()->fstat(fd, info); result != 0) {
      return result;
    }
  } else {
    const auto entry = entries_.find(open.resolved);
    if (entry == entries_.end()) {
      return -ESTALE;
    }
    info = statusOf(entry->second);
  }
  applyChanges(open.name, info);
  return 0;
}

int FakeFileSystem::statAt(int directory, const std::string& path, struct stat& info) {
  std::lock_guard<std::mutex> lock(mutex_);
  std::string name;
  if (const int result = begin(Call::StatAt, directory, path, name); result != 0) {
    return result;
  }
  if (real_) {
    if (const int result = systemFileSystem()->statAt(directory, path, info); result != 0) {
      return result;
    }
  } else {
    int error = 0;
    const std::string resolved = resolve(name, true, error);
    if (resolved.empty()) {
      return -error;
    }
    info = statusOf(entries_.at(resolved));
  }
  applyChanges(name, info);
  return 0;
}

int FakeFileSystem::readLinkAt(int directory, const std::string& path, std::string& target) {
  std::lock_guard<std::mutex> lock(mutex_);
  std::string name;
  if (const int result = begin(Call::ReadLink, directory, path, name); result != 0) {
    return result;
  }
  if (real_) {
    return systemFileSystem()->readLinkAt(directory, path, target);
  }
  int error = 0;
  const std::string resolved = resolve(name, false, error);
  if (resolved.empty()) {
    return -error;
  }
  const Entry& entry = entries_.at(resolved);
  if (entry.kind != Kind::Symlink) {
    return -EINVAL;
  }
  target = entry.content;
  return 0;
}

int FakeFileSystem::listDirectory(int fd, std::vector<std::string>& names) {
  std::lock_guard<std::mutex> lock(mutex_);
  int result = 0;
  const Open* const opened = begin(Call::List, fd, result);
  if (opened == nullptr) {
    return result;
  }
  const Open& open = *opened;
  if (real_) {
    return systemFileSystem()->listDirectory(fd, names);
  }
  const auto folder = entries_.find(open.resolved);
  if (folder == entries_.end()) {
    return -ENOENT;
  }
  if (folder->second.kind != Kind::Directory) {
    return -ENOTDIR;
  }
  const std::string prefix = open.resolved == "/" ? "/" : open.resolved + "/";
  std::vector<std::string> children;
  for (auto entry = entries_.upper_bound(prefix);
       entry != entries_.end() && entry->first.rfind(prefix, 0) == 0; ++entry) {
    const std::string rest = entry->first.substr(prefix.size());
    if (!rest.empty() && rest.find('/') == std::string::npos) {
      children.push_back(rest);
    }
  }
  names = std::move(children);
  return 0;
}

}  // namespace platform_test
