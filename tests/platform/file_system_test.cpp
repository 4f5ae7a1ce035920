// The real file system behind the seam, on files made in temporary folders: what each call
// returns, and the whole-file reads built on it.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <filesystem>
#include <string>
#include <vector>

#include "PlatformTestSupport.h"
#include "os/FileIo.h"
#include "os/FileSystem.h"

namespace {

using Kesta::platform::FileSystem;
using Kesta::platform::FileSystemFd;
using Kesta::platform::kWorkingDirectory;
using Kesta::platform::readRegularFile;
using Kesta::platform::ReadResult;
using Kesta::platform::systemFileSystem;
using platform_test::writeFileIn;
using testsupport::TempDir;

class SystemFileSystemTest : public ::testing::Test {
 protected:
  std::vector<std::string> listed(int fd) {
    std::vector<std::string> names;
    EXPECT_EQ(files_.listDirectory(fd, names), 0);
    std::sort(names.begin(), names.end());
    return names;
  }

  FileSystem& files_ = *systemFileSystem();
  TempDir dir_;
};

TEST_F(SystemFileSystemTest, IsOneSharedInstance) {
  EXPECT_EQ(systemFileSystem().get(), systemFileSystem().get());
}

TEST_F(SystemFileSystemTest, OpensExaminesAndReadsARegularFile) {
  writeFileIn(dir_.file("f"), "hello, world");
  const FileSystemFd fd(files_, files_.openForReading(kWorkingDirectory, dir_.file("f")));
  ASSERT_TRUE(fd);
  struct stat info = {};
  ASSERT_EQ(files_.fstat(fd.get(), info), 0);
  EXPECT_TRUE(S_ISREG(info.st_mode));
  EXPECT_EQ(info.st_size, 12);
  char buffer[5] = {};
  EXPECT_EQ(files_.read(fd.get(), buffer, sizeof buffer), 5);
  EXPECT_EQ(std::string(buffer, 5), "hello");
  char rest[64] = {};
  EXPECT_EQ(files_.read(fd.get(), rest, sizeof rest), 7);
  EXPECT_EQ(files_.read(fd.get(), rest, sizeof rest), 0);
}

TEST_F(SystemFileSystemTest, ErrorsAreNegatedErrnoValues) {
  EXPECT_EQ(files_.openForReading(kWorkingDirectory, dir_.file("absent")), -ENOENT);
  EXPECT_EQ(files_.openForReading(kWorkingDirectory, ""), -ENOENT);
  writeFileIn(dir_.file("f"), "x");
  EXPECT_EQ(files_.openForReading(kWorkingDirectory, dir_.file("f/below")), -ENOTDIR);
  EXPECT_EQ(files_.openDirectory(kWorkingDirectory, dir_.file("f")), -ENOTDIR);
  struct stat info = {};
  EXPECT_EQ(files_.statAt(kWorkingDirectory, dir_.file("absent"), info), -ENOENT);
  EXPECT_EQ(files_.fstat(-1, info), -EBADF);
  char byte = 0;
  EXPECT_EQ(files_.read(-1, &byte, 1), -EBADF);
  EXPECT_EQ(files_.close(-1), -EBADF);
}

TEST_F(SystemFileSystemTest, OpensFilesRelativeToADirectory) {
  writeFileIn(dir_.file("sub/name"), "value\n");
  const FileSystemFd directory(files_, files_.openDirectory(kWorkingDirectory, dir_.path()));
  ASSERT_TRUE(directory);
  const ReadResult read = readRegularFile(files_, directory.get(), "sub/name", 100);
  ASSERT_TRUE(read.ok()) << read.reason;
  EXPECT_EQ(read.data, "value\n");
  struct stat info = {};
  EXPECT_EQ(files_.statAt(directory.get(), "sub", info), 0);
  EXPECT_TRUE(S_ISDIR(info.st_mode));
}

TEST_F(SystemFileSystemTest, ADirectoryIsRefused) {
  const ReadResult read = readRegularFile(files_, dir_.path(), 10);
  EXPECT_EQ(read.error, EISDIR);
  EXPECT_EQ(read.reason, "it is a directory");
}

TEST_F(SystemFileSystemTest, AFifoOpensWithoutWaitingAndIsRefused) {
  // No writer ever opens the FIFO: a blocking open or read would hang this test.
  ASSERT_EQ(::mkfifo(dir_.file("fifo").c_str(), 0600), 0);
  const FileSystemFd fd(files_, files_.openForReading(kWorkingDirectory, dir_.file("fifo")));
  ASSERT_TRUE(fd);
  struct stat info = {};
  ASSERT_EQ(files_.fstat(fd.get(), info), 0);
  EXPECT_TRUE(S_ISFIFO(info.st_mode));
  const ReadResult read = readRegularFile(files_, dir_.file("fifo"), 10);
  EXPECT_EQ(read.error, EINVAL);
  EXPECT_EQ(read.reason, "it is not a regular file");
}

TEST_F(SystemFileSystemTest, ADeviceIsRefused) {
  const ReadResult read = readRegularFile(files_, "/dev/zero", 10);
  EXPECT_EQ(read.error, EINVAL);
  EXPECT_EQ(read.reason, "it is not a regular file");
}

TEST_F(SystemFileSystemTest, TheSizeLimitHolds) {
  writeFileIn(dir_.file("f"), "12345");
  EXPECT_TRUE(readRegularFile(files_, dir_.file("f"), 5).ok());
  const ReadResult read = readRegularFile(files_, dir_.file("f"), 4);
  EXPECT_EQ(read.error, EFBIG);
  EXPECT_EQ(read.reason, "it is larger than 4 bytes");
}

TEST_F(SystemFileSystemTest, AFileWhoseSizeIsOnlyAHintIsReadToItsEnd) {
  // procfs reports a size of 0 for files that hold plenty.
  const ReadResult read = readRegularFile(files_, "/proc/self/status", 1 << 20);
  ASSERT_TRUE(read.ok()) << read.reason;
  EXPECT_EQ(read.info.st_size, 0);
  EXPECT_EQ(read.data.rfind("Name:", 0), 0u);
}

TEST_F(SystemFileSystemTest, StatAtFollowsSymbolicLinks) {
  std::filesystem::create_directories(dir_.file("devices/led"));
  std::filesystem::create_symlink("devices/led", dir_.file("link"));
  std::filesystem::create_symlink("devices/nowhere", dir_.file("dangling"));
  struct stat info = {};
  ASSERT_EQ(files_.statAt(kWorkingDirectory, dir_.file("link"), info), 0);
  EXPECT_TRUE(S_ISDIR(info.st_mode));
  EXPECT_EQ(files_.statAt(kWorkingDirectory, dir_.file("dangling"), info), -ENOENT);
}

TEST_F(SystemFileSystemTest, ReadsTheTextOfALinkThatDangles) {
  std::filesystem::create_symlink("../../devices/nowhere", dir_.file("device"));
  const FileSystemFd directory(files_, files_.openDirectory(kWorkingDirectory, dir_.path()));
  std::string target = "unchanged";
  ASSERT_EQ(files_.readLinkAt(directory.get(), "device", target), 0);
  EXPECT_EQ(target, "../../devices/nowhere");
  EXPECT_EQ(files_.readLinkAt(kWorkingDirectory, dir_.file("device"), target), 0);
  EXPECT_EQ(target, "../../devices/nowhere");

  writeFileIn(dir_.file("plain"), "x");
  target = "unchanged";
  EXPECT_EQ(files_.readLinkAt(directory.get(), "plain", target), -EINVAL);
  EXPECT_EQ(files_.readLinkAt(directory.get(), "absent", target), -ENOENT);
  EXPECT_EQ(target, "unchanged");
}

TEST_F(SystemFileSystemTest, ListsADirectoryWithoutDotAndDotDot) {
  writeFileIn(dir_.file("a"), "");
  writeFileIn(dir_.file("sub/b"), "");
  writeFileIn(dir_.file(".hidden"), "");
  std::filesystem::create_symlink("nowhere", dir_.file("dangling"));
  const FileSystemFd directory(files_, files_.openDirectory(kWorkingDirectory, dir_.path()));
  ASSERT_TRUE(directory);
  const std::vector<std::string> expected = {".hidden", "a", "dangling", "sub"};
  EXPECT_EQ(listed(directory.get()), expected);
  // Every listing starts at the beginning, and the descriptor still names the directory.
  EXPECT_EQ(listed(directory.get()), expected);
  EXPECT_TRUE(readRegularFile(files_, directory.get(), "a", 10).ok());
}

TEST_F(SystemFileSystemTest, ListsAnEmptyDirectory) {
  const FileSystemFd directory(files_, files_.openDirectory(kWorkingDirectory, dir_.path()));
  EXPECT_TRUE(listed(directory.get()).empty());
}

TEST_F(SystemFileSystemTest, ADescriptorIsClosedWhenItsOwnerGoes) {
  writeFileIn(dir_.file("f"), "x");
  int raw = -1;
  {
    const FileSystemFd fd(files_, files_.openForReading(kWorkingDirectory, dir_.file("f")));
    raw = fd.get();
    ASSERT_GE(raw, 0);
    struct stat info = {};
    EXPECT_EQ(files_.fstat(raw, info), 0);
  }
  struct stat info = {};
  EXPECT_EQ(files_.fstat(raw, info), -EBADF);
}

TEST_F(SystemFileSystemTest, AFailedOpenIsHeldAsNoDescriptor) {
  FileSystemFd fd(files_, -ENOENT);
  EXPECT_FALSE(fd);
  EXPECT_EQ(fd.get(), -1);
  fd.reset();  // closes nothing
  FileSystemFd none;
  EXPECT_FALSE(none);
}

}  // namespace
