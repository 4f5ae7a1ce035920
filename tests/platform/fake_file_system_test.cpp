// The stand-in file system of the tests: its in-memory tree, the real files passed through, and
// the failures it injects - and the whole-file reads, on cases only it can make.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <stdexcept>
#include <string>
#include <vector>

#include "FakeFileSystem.h"
#include "PlatformTestSupport.h"
#include "os/FileIo.h"

namespace {

using Kesta::platform::FileSystemFd;
using Kesta::platform::kWorkingDirectory;
using Kesta::platform::readRegularFile;
using Kesta::platform::ReadResult;
using platform_test::FakeFileSystem;
using platform_test::writeFileIn;
using testsupport::TempDir;
using Call = FakeFileSystem::Call;

std::vector<std::string> sortedListing(FakeFileSystem& files, const std::string& path) {
  const FileSystemFd directory(files, files.openDirectory(kWorkingDirectory, path));
  std::vector<std::string> names;
  EXPECT_EQ(files.listDirectory(directory.get(), names), 0) << path;
  std::sort(names.begin(), names.end());
  return names;
}

TEST(FakeFileSystem, ServesAnInMemoryTree) {
  FakeFileSystem files;
  files.addFile("/class/led/brightness", "255\n");
  files.addDirectory("/class/empty");
  const ReadResult read = readRegularFile(files, "/class/led/brightness", 100);
  ASSERT_TRUE(read.ok()) << read.reason;
  EXPECT_EQ(read.data, "255\n");
  EXPECT_TRUE(S_ISREG(read.info.st_mode));
  EXPECT_EQ(read.info.st_uid, ::geteuid());
  EXPECT_EQ(sortedListing(files, "/"), std::vector<std::string>{"class"});
  EXPECT_EQ(sortedListing(files, "/class"), (std::vector<std::string>{"empty", "led"}));
  EXPECT_TRUE(sortedListing(files, "/class/empty").empty());
  EXPECT_EQ(readRegularFile(files, "/class", 100).reason, "it is a directory");
  EXPECT_EQ(readRegularFile(files, "/class/absent", 100).error, ENOENT);
  EXPECT_EQ(readRegularFile(files, "/class/led/brightness/x", 100).error, ENOTDIR);
  EXPECT_EQ(files.openDirectory(kWorkingDirectory, "/class/led/brightness"), -ENOTDIR);
  EXPECT_EQ(files.openDescriptors(), 0u);
  EXPECT_EQ(files.strayCloses(), 0u);
}

TEST(FakeFileSystem, ReadsRelativeToADirectoryDescriptor) {
  FakeFileSystem files;
  files.addFile("/t/led/trigger", "none [timer]\n");
  const FileSystemFd directory(files, files.openDirectory(kWorkingDirectory, "/t"));
  ASSERT_TRUE(directory);
  EXPECT_EQ(readRegularFile(files, directory.get(), "led/trigger", 100).data, "none [timer]\n");
  EXPECT_EQ(readRegularFile(files, kWorkingDirectory, "t/led/trigger", 100).data, "none [timer]\n");
  EXPECT_EQ(files.openForReading(12345, "led/trigger"), -EBADF);
}

TEST(FakeFileSystem, FollowsSymbolicLinksAsTheKernelDoes) {
  FakeFileSystem files;
  files.addFile("/sys/devices/platform/leds/a:blue:uid/trigger", "[heartbeat]\n");
  files.addSymlink("/sys/class/leds/a:blue:uid", "../../devices/platform/leds/a:blue:uid");
  files.addSymlink("/sys/class/leds/absolute", "/sys/devices/platform/leds/a:blue:uid");
  files.addSymlink("/sys/class/leds/dangling", "../../devices/nowhere");
  files.addSymlink("/loop/a", "b");
  files.addSymlink("/loop/b", "a");

  EXPECT_EQ(readRegularFile(files, "/sys/class/leds/a:blue:uid/trigger", 100).data,
            "[heartbeat]\n");
  EXPECT_EQ(readRegularFile(files, "/sys/class/leds/absolute/trigger", 100).data, "[heartbeat]\n");
  struct stat info = {};
  ASSERT_EQ(files.statAt(kWorkingDirectory, "/sys/class/leds/a:blue:uid", info), 0);
  EXPECT_TRUE(S_ISDIR(info.st_mode));
  EXPECT_EQ(files.statAt(kWorkingDirectory, "/sys/class/leds/dangling", info), -ENOENT);
  EXPECT_EQ(files.statAt(kWorkingDirectory, "/loop/a", info), -ELOOP);

  std::string target;
  ASSERT_EQ(files.readLinkAt(kWorkingDirectory, "/sys/class/leds/dangling", target), 0);
  EXPECT_EQ(target, "../../devices/nowhere");
  EXPECT_EQ(files.readLinkAt(kWorkingDirectory, "/sys/class", target), -EINVAL);
  EXPECT_EQ(files.readLinkAt(kWorkingDirectory, "/sys/absent", target), -ENOENT);
  EXPECT_EQ(sortedListing(files, "/sys/class/leds"),
            (std::vector<std::string>{"a:blue:uid", "absolute", "dangling"}));
  // A listing through a link lists the folder it leads to.
  EXPECT_EQ(sortedListing(files, "/sys/class/leds/a:blue:uid"),
            std::vector<std::string>{"trigger"});
}

TEST(FakeFileSystem, AFifoOpensAndIsRefusedWithoutARead) {
  FakeFileSystem files;
  files.addFifo("/run/fifo");
  const ReadResult read = readRegularFile(files, "/run/fifo", 10);
  EXPECT_EQ(read.reason, "it is not a regular file");
  EXPECT_EQ(files.count(Call::Read, "/run/fifo"), 0u);
  EXPECT_EQ(files.count(Call::Close, "/run/fifo"), 1u);
}

TEST(FakeFileSystem, ARewrittenFileIsAnotherVersionOfTheSameFile) {
  FakeFileSystem files;
  files.addFile("/c.mo", "one");
  struct stat before = {};
  ASSERT_EQ(files.statAt(kWorkingDirectory, "/c.mo", before), 0);
  files.addFile("/c.mo", "two");
  struct stat after = {};
  ASSERT_EQ(files.statAt(kWorkingDirectory, "/c.mo", after), 0);
  EXPECT_EQ(before.st_ino, after.st_ino);
  EXPECT_NE(before.st_mtim.tv_nsec, after.st_mtim.tv_nsec);
  files.remove("/c.mo");
  EXPECT_EQ(files.statAt(kWorkingDirectory, "/c.mo", after), -ENOENT);
}

TEST(FakeFileSystem, FailuresAreMetHoweverThePathIsWritten) {
  FakeFileSystem files;
  files.addFile("/t/led/brightness", "1\n");
  files.fail(Call::Open, "/t/led/brightness", EACCES);
  const FileSystemFd directory(files, files.openDirectory(kWorkingDirectory, "/t"));
  for (const std::string path : {"led/brightness", "./led/../led/brightness"}) {
    const ReadResult read = readRegularFile(files, directory.get(), path, 10);
    EXPECT_EQ(read.error, EACCES) << path;
    EXPECT_EQ(read.reason, "Permission denied") << path;
  }
  EXPECT_EQ(readRegularFile(files, "/t/led/brightness", 10).error, EACCES);
  EXPECT_EQ(files.count(Call::Open, "/t/led/brightness"), 3u);
  EXPECT_EQ(files.count(Call::Read, "/t/led/brightness"), 0u);
}

TEST(FakeFileSystem, EveryKindOfCallCanFail) {
  FakeFileSystem files;
  files.addFile("/f", "text");
  files.addDirectory("/d");
  files.addSymlink("/l", "f");

  files.fail(Call::Read, "/f", EIO);
  EXPECT_EQ(readRegularFile(files, "/f", 10).reason, "Input/output error");
  files.fail(Call::Fstat, "/f", ENOMEM, 1);
  EXPECT_EQ(readRegularFile(files, "/f", 10).reason, "Cannot allocate memory");
  files.fail(Call::OpenDirectory, "/d", EACCES, 1);
  EXPECT_EQ(files.openDirectory(kWorkingDirectory, "/d"), -EACCES);
  struct stat info = {};
  files.fail(Call::StatAt, "/l", EIO, 1);
  EXPECT_EQ(files.statAt(kWorkingDirectory, "/l", info), -EIO);
  std::string target;
  files.fail(Call::ReadLink, "/l", EACCES, 1);
  EXPECT_EQ(files.readLinkAt(kWorkingDirectory, "/l", target), -EACCES);
  const FileSystemFd directory(files, files.openDirectory(kWorkingDirectory, "/d"));
  std::vector<std::string> names;
  files.fail(Call::List, "/d", EIO, 1);
  EXPECT_EQ(files.listDirectory(directory.get(), names), -EIO);
  EXPECT_EQ(files.listDirectory(directory.get(), names), 0);
  // A failing close still closes, as close(2) does on Linux.
  const int fd = files.openForReading(kWorkingDirectory, "/d");
  files.fail(Call::Close, "/d", EIO, 1);
  EXPECT_EQ(files.close(fd), -EIO);
  EXPECT_EQ(files.close(fd), -EBADF);
  EXPECT_EQ(files.strayCloses(), 1u);
}

TEST(FakeFileSystem, AFailureForSomeTimesThenPassesThrough) {
  FakeFileSystem files;
  files.addFile("/f", "text");
  files.fail(Call::Read, "/f", EINTR, 2);
  // An interrupted read is repeated, so the file is read all the same.
  const ReadResult read = readRegularFile(files, "/f", 10);
  ASSERT_TRUE(read.ok()) << read.reason;
  EXPECT_EQ(read.data, "text");
  EXPECT_EQ(files.count(Call::Read, "/f"), 4u);  // two interrupted, one with the text, the end
}

TEST(FakeFileSystem, ChangedStatusIsReportedByFstatAndStatAt) {
  FakeFileSystem files;
  files.addFile("/etc/bmc.conf", "user = a\n", 0600);
  files.changeStatus("/etc/bmc.conf", [](struct stat& info) {
    info.st_uid = 4242;
    info.st_mode = S_IFREG | 0640;
  });
  struct stat info = {};
  ASSERT_EQ(files.statAt(kWorkingDirectory, "/etc/bmc.conf", info), 0);
  EXPECT_EQ(info.st_uid, 4242u);
  EXPECT_EQ(info.st_mode & 07777, 0640u);
  const FileSystemFd fd(files, files.openForReading(kWorkingDirectory, "/etc/bmc.conf"));
  ASSERT_EQ(files.fstat(fd.get(), info), 0);
  EXPECT_EQ(info.st_uid, 4242u);
}

TEST(FakeFileSystem, RecordsEveryCallWithItsPath) {
  FakeFileSystem files;
  files.addFile("/t/a", "x");
  const FileSystemFd directory(files, files.openDirectory(kWorkingDirectory, "/t"));
  std::vector<std::string> names;
  files.listDirectory(directory.get(), names);
  struct stat info = {};
  files.statAt(directory.get(), "a", info);
  readRegularFile(files, directory.get(), "a", 10);
  EXPECT_EQ(files.calls(),
            (std::vector<std::string>{"opendir /t", "list /t", "stat /t/a", "open /t/a",
                                      "fstat /t/a", "read /t/a", "read /t/a", "close /t/a"}));
  files.clearCalls();
  EXPECT_TRUE(files.calls().empty());
}

TEST(FakeFileSystem, SizesThatAreOnlyHintsAndFilesThatGrow) {
  FakeFileSystem files;
  // A sysfs attribute reports 4096 bytes whatever it holds.
  files.addFile("/sys/a/brightness", "0\n");
  files.changeStatus("/sys/a/brightness", [](struct stat& info) { info.st_size = 4096; });
  EXPECT_EQ(readRegularFile(files, "/sys/a/brightness", std::size_t{64} * 1024).data, "0\n");
  // A file that reports less than it holds is still held to the limit.
  files.addFile("/proc/big", std::string(100, 'x'));
  files.changeStatus("/proc/big", [](struct stat& info) { info.st_size = 0; });
  EXPECT_EQ(readRegularFile(files, "/proc/big", 100).data, std::string(100, 'x'));
  const ReadResult tooBig = readRegularFile(files, "/proc/big", 99);
  EXPECT_EQ(tooBig.error, EFBIG);
  EXPECT_EQ(tooBig.reason, "it is larger than 99 bytes");
  EXPECT_EQ(files.openDescriptors(), 0u);
}

TEST(FakeFileSystem, PassesTheRealFilesThrough) {
  TempDir dir;
  writeFileIn(dir.file("leds/x/brightness"), "7\n");
  const auto files = FakeFileSystem::overRealFiles();
  const FileSystemFd directory(*files, files->openDirectory(kWorkingDirectory, dir.file("leds")));
  ASSERT_TRUE(directory);
  EXPECT_EQ(readRegularFile(*files, directory.get(), "x/brightness", 10).data, "7\n");
  std::vector<std::string> names;
  ASSERT_EQ(files->listDirectory(directory.get(), names), 0);
  EXPECT_EQ(names, std::vector<std::string>{"x"});
  EXPECT_EQ(readRegularFile(*files, dir.file("absent"), 10).error, ENOENT);
  EXPECT_EQ(files->count(Call::Open, dir.file("leds/x/brightness")), 1u);
  EXPECT_THROW(files->addFile("/x", ""), std::logic_error);
}

TEST(FakeFileSystem, InjectsFailuresIntoTheRealFilesAlsoForRoot) {
  TempDir dir;
  writeFileIn(dir.file("secret.json"), "{}");
  const auto files = FakeFileSystem::overRealFiles();
  files->fail(Call::Open, dir.file("secret.json"), EACCES);
  EXPECT_EQ(readRegularFile(*files, dir.file("secret.json"), 10).reason, "Permission denied");
  writeFileIn(dir.file("disk"), "bytes");
  files->fail(Call::Read, dir.file("disk"), EIO);
  EXPECT_EQ(readRegularFile(*files, dir.file("disk"), 10).reason, "Input/output error");
  files->changeStatus(dir.file("disk"), [](struct stat& info) { info.st_uid = 65534; });
  struct stat info = {};
  ASSERT_EQ(files->statAt(kWorkingDirectory, dir.file("disk"), info), 0);
  EXPECT_EQ(info.st_uid, 65534u);
  EXPECT_EQ(files->openDescriptors(), 0u);
}

}  // namespace
