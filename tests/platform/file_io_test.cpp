// Whole-file reads: regular files only, to their real end, within a limit.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cerrno>
#include <string>

#include "PlatformTestSupport.h"
#include "os/FileIo.h"

namespace {

using namespace Kesta::platform;
using platform_test::writeFileIn;
using testsupport::TempDir;

TEST(FileIo, ReadsAWholeFile) {
  TempDir dir;
  const std::string content(100000, 'x');
  writeFileIn(dir.file("f"), content);
  const ReadResult read = readRegularFile(dir.file("f"), 1 << 20);
  ASSERT_TRUE(read.ok()) << read.reason;
  EXPECT_EQ(read.data, content);
}

TEST(FileIo, ReadsAnEmptyFile) {
  TempDir dir;
  writeFileIn(dir.file("f"), "");
  const ReadResult read = readRegularFile(dir.file("f"), 10);
  ASSERT_TRUE(read.ok());
  EXPECT_EQ(read.data, "");
}

TEST(FileIo, ReportsAMissingFile) {
  TempDir dir;
  const ReadResult read = readRegularFile(dir.file("missing"), 10);
  EXPECT_EQ(read.error, ENOENT);
  EXPECT_EQ(read.reason, "No such file or directory");
}

TEST(FileIo, RefusesADirectory) {
  TempDir dir;
  const ReadResult read = readRegularFile(dir.path(), 10);
  EXPECT_EQ(read.error, EISDIR);
  EXPECT_EQ(read.reason, "it is a directory");
}

TEST(FileIo, RefusesAFifoWithoutWaiting) {
  TempDir dir;
  ASSERT_EQ(::mkfifo((dir.file("fifo")).c_str(), 0600), 0);
  const ReadResult read = readRegularFile(dir.file("fifo"), 10);
  EXPECT_FALSE(read.ok());
  EXPECT_EQ(read.reason, "it is not a regular file");
}

TEST(FileIo, RefusesAFileOverTheLimit) {
  TempDir dir;
  writeFileIn(dir.file("f"), "12345");
  EXPECT_TRUE(readRegularFile(dir.file("f"), 5).ok());
  const ReadResult read = readRegularFile(dir.file("f"), 4);
  EXPECT_EQ(read.error, EFBIG);
}

TEST(FileIo, ReadsRelativeToADirectory) {
  TempDir dir;
  writeFileIn(dir.file("sub/name"), "value\n");
  const Kesta::platform::UniqueFd fd(::open(dir.path().c_str(), O_RDONLY | O_DIRECTORY));
  ASSERT_TRUE(fd);
  const ReadResult read = readRegularFile(fd.get(), "sub/name", 100);
  ASSERT_TRUE(read.ok());
  EXPECT_EQ(read.data, "value\n");
}

TEST(FileIo, ErrorTextIsTheSystemsText) { EXPECT_EQ(errorText(EACCES), "Permission denied"); }

TEST(FileIo, UniqueFdClosesAndReleases) {
  TempDir dir;
  writeFileIn(dir.file("f"), "x");
  int raw = -1;
  {
    Kesta::platform::UniqueFd fd(::open((dir.file("f")).c_str(), O_RDONLY));
    ASSERT_TRUE(fd);
    raw = fd.get();
    Kesta::platform::UniqueFd moved(std::move(fd));
    // What a moved-from descriptor holds is what the test is about.
    EXPECT_FALSE(fd);  // NOLINT(bugprone-use-after-move)
    EXPECT_EQ(moved.get(), raw);
  }
  errno = 0;
  EXPECT_EQ(::fcntl(raw, F_GETFD), -1);
  EXPECT_EQ(errno, EBADF);
}

}  // namespace
