// The credentials file of "ipmi-lan:" sources: its format, its permissions, and that no value
// from it ever appears in a message.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <string>

#include "FakeFileSystem.h"
#include "PlatformTestSupport.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/ipmi/IpmiCredentials.h"

namespace {

using Kesta::platform::credentialsFileProblem;
using Kesta::platform::IpmiCredentials;
using Kesta::platform::IpmiPrivilege;
using Kesta::platform::isSupportedCipherSuite;
using Kesta::platform::parseIpmiCredentials;
using Kesta::platform::readIpmiCredentials;
using Kesta::platform::SourceError;
using Kesta::platform::wipe;
using platform_test::FakeFileSystem;
using testsupport::TempDir;
using Call = FakeFileSystem::Call;

const std::string kFile = "/etc/kesta/bmc.conf";
const std::string kSecret = "pa55-w0rd#=x";
// A secret on a line of its own, where a name belongs.
const std::string kLoneSecret = "pa55-w0rd#x";

std::string parseError(const std::string& text) {
  try {
    parseIpmiCredentials(text, kFile);
  } catch (const SourceError& error) {
    return error.what();
  }
  return "(accepted)";
}

std::string readError(const std::string& file) {
  try {
    readIpmiCredentials(file);
  } catch (const SourceError& error) {
    return error.what();
  }
  return "(accepted)";
}

std::string readError(const std::string& file, FakeFileSystem& files) {
  try {
    readIpmiCredentials(file, files);
  } catch (const SourceError& error) {
    return error.what();
  }
  return "(accepted)";
}

void writeWithMode(const std::string& file, const std::string& text, mode_t mode) {
  platform_test::writeFileIn(file, text);
  ASSERT_EQ(::chmod(file.c_str(), mode), 0);
}

TEST(IpmiCredentialsFormat, UserAndPasswordWithDefaults) {
  const IpmiCredentials credentials =
      parseIpmiCredentials("user = monitor\npassword = s3cret\n", kFile);
  EXPECT_EQ(credentials.user, "monitor");
  EXPECT_EQ(credentials.password, "s3cret");
  EXPECT_EQ(credentials.privilege, IpmiPrivilege::User);
  EXPECT_EQ(credentials.cipherSuite, 3u);
}

TEST(IpmiCredentialsFormat, EverySetting) {
  const IpmiCredentials credentials = parseIpmiCredentials(
      "# the account of the blue light provider\r\n"
      "\n"
      "   USER=ops\r\n"
      "\tpassword\t=\t" +
          kSecret +
          "  \n"
          "  # privilege = administrator\n"
          "Privilege = Operator\n"
          "cipher-suite = 12",
      kFile);
  EXPECT_EQ(credentials.user, "ops");
  // Everything after the first '=' is the value, '#' and '=' included; only the blanks around
  // it go.
  EXPECT_EQ(credentials.password, kSecret);
  EXPECT_EQ(credentials.privilege, IpmiPrivilege::Operator);
  EXPECT_EQ(credentials.cipherSuite, 12u);
}

TEST(IpmiCredentialsFormat, PrivilegeNames) {
  EXPECT_EQ(parseIpmiCredentials("user=a\npassword=b\nprivilege=user", kFile).privilege,
            IpmiPrivilege::User);
  EXPECT_EQ(parseIpmiCredentials("user=a\npassword=b\nprivilege=administrator", kFile).privilege,
            IpmiPrivilege::Administrator);
  EXPECT_EQ(parseIpmiCredentials("user=a\npassword=b\nprivilege=ADMIN", kFile).privilege,
            IpmiPrivilege::Administrator);
}

TEST(IpmiCredentialsFormat, EmptyUserAndPasswordAreTheAnonymousAccount) {
  const IpmiCredentials credentials = parseIpmiCredentials("user =\npassword =\n", kFile);
  EXPECT_EQ(credentials.user, "");
  EXPECT_EQ(credentials.password, "");
}

TEST(IpmiCredentialsFormat, LongestUserAndPassword) {
  const IpmiCredentials credentials = parseIpmiCredentials(
      "user=" + std::string(16, 'u') + "\npassword=" + std::string(20, 'p'), kFile);
  EXPECT_EQ(credentials.user.size(), 16u);
  EXPECT_EQ(credentials.password.size(), 20u);
}

TEST(IpmiCredentialsFormat, CipherSuites) {
  for (unsigned int suite = 0; suite < 20; ++suite) {
    const bool supported = suite == 1 || suite == 2 || suite == 3 || suite == 6 || suite == 7 ||
                           suite == 8 || suite == 11 || suite == 12;
    EXPECT_EQ(isSupportedCipherSuite(suite), supported) << suite;
  }
  EXPECT_EQ(parseIpmiCredentials("user=a\npassword=b\ncipher-suite=2", kFile).cipherSuite, 2u);
}

TEST(IpmiCredentialsFormat, RefusesWhatItCannotUse) {
  const std::string prefix = "credentials file \"/etc/kesta/bmc.conf\" ";
  EXPECT_EQ(parseError(""), prefix + "has no \"user = ...\" line");
  EXPECT_EQ(parseError("user=a\n"), prefix + "has no \"password = ...\" line");
  EXPECT_EQ(parseError("password=b\n"), prefix + "has no \"user = ...\" line");
  EXPECT_EQ(parseError("user=a\npassword=b\nuser=c"), prefix + "line 3: \"user\" is given twice");
  EXPECT_EQ(parseError("user=a\n\n" + kLoneSecret + "\n"),
            prefix + "line 3 is not \"name = value\"");
  EXPECT_EQ(parseError("user=" + std::string(17, 'u') + "\npassword=b"),
            prefix + "line 1: the user name is longer than 16 bytes");
  EXPECT_EQ(parseError("user=a\npassword=" + std::string(21, 'p')),
            prefix + "line 2: the password is longer than 20 bytes");
  EXPECT_EQ(parseError("user=a\npassword=b\nprivilege=callback"),
            prefix + "line 3: privilege must be user, operator or administrator");
  for (const char* suite : {"0", "4", "17", "x", "", "03a", "1000"}) {
    EXPECT_EQ(parseError(std::string("user=a\npassword=b\ncipher-suite=") + suite),
              prefix +
                  "line 3: cipher-suite must be one of 1, 2, 3, 6, 7, 8, 11 or 12 (3 is the usual "
                  "choice; 0 would send no authentication and is refused)")
        << suite;
  }
  EXPECT_EQ(parseError("user=a\npassword=b\nhost=bmc"),
            prefix +
                "line 3: unknown name (expected user, password, privilege or "
                "cipher-suite)");
  EXPECT_EQ(parseError(std::string("user=a\npassword=b\0c", 19)),
            prefix + "line 2: the value holds a NUL character");
}

TEST(IpmiCredentialsFormat, MessagesNeverShowAValue) {
  // Every refusal of a file holding the secret, wherever it sits, leaves the secret out.
  const std::string texts[] = {
      "user=" + kSecret + kSecret + "\npassword=x",
      "user=a\npassword=" + kSecret + kSecret,
      "user=a\n" + kLoneSecret,
      "user=a\n" + kSecret,
      "user=a\npassword=b\nprivilege=" + kSecret,
      "user=a\npassword=b\ncipher-suite=" + kSecret,
      "user=a\npassword=" + kSecret + "\npassword=" + kSecret,
      "user=a\npassword=b\n" + kSecret + kSecret + kSecret + "=1",
  };
  for (const std::string& text : texts) {
    const std::string message = parseError(text);
    EXPECT_NE(message, "(accepted)") << text;
    EXPECT_EQ(message.find("pa55"), std::string::npos) << message;
  }
}

TEST(IpmiCredentialsFormat, WipeOverwritesAndEmpties) {
  std::string text = kSecret;
  wipe(text);
  EXPECT_TRUE(text.empty());
}

TEST(IpmiCredentialsPermissions, ProblemsOfTheFileStatus) {
  struct stat info = {};
  info.st_mode = S_IFREG | 0600;
  info.st_uid = 1000;
  EXPECT_EQ(credentialsFileProblem(info, 1000), "");
  info.st_mode = S_IFREG | 0400;
  EXPECT_EQ(credentialsFileProblem(info, 1000), "");
  info.st_uid = 0;  // root's files may be read by any account that can open them
  EXPECT_EQ(credentialsFileProblem(info, 1000), "");
  info.st_uid = 1001;
  EXPECT_EQ(credentialsFileProblem(info, 1000),
            "belongs to user 1001, not to 1000 (the user the provider runs as) or root");
  info.st_uid = 1000;
  for (const mode_t open : {0640, 0604, 0620, 0602, 0610, 0601, 0660, 0644, 0666, 0777}) {
    info.st_mode = S_IFREG | open;
    char expected[128] = {};
    std::snprintf(expected, sizeof expected,
                  "has mode %04o, which lets others read or change it; allow its owner only "
                  "(chmod 600)",
                  static_cast<unsigned int>(open));
    EXPECT_EQ(credentialsFileProblem(info, 1000), expected);
  }
  info.st_mode = S_IFDIR | 0700;
  EXPECT_EQ(credentialsFileProblem(info, 1000), "is not a regular file");
  info.st_mode = S_IFIFO | 0600;
  EXPECT_EQ(credentialsFileProblem(info, 1000), "is not a regular file");
}

TEST(IpmiCredentialsFile, ReadsAPrivateFile) {
  TempDir dir;
  const std::string file = dir.file("bmc.conf");
  writeWithMode(file, "user = monitor\npassword = " + kSecret + "\n", 0600);
  const IpmiCredentials credentials = readIpmiCredentials(file);
  EXPECT_EQ(credentials.user, "monitor");
  EXPECT_EQ(credentials.password, kSecret);
}

TEST(IpmiCredentialsFile, RefusesAFileOthersCanRead) {
  TempDir dir;
  const std::string file = dir.file("bmc.conf");
  writeWithMode(file, "user = monitor\npassword = " + kSecret + "\n", 0644);
  EXPECT_EQ(readError(file), "credentials file \"" + file +
                                 "\" has mode 0644, which lets others read or change it; allow "
                                 "its owner only (chmod 600)");
  ASSERT_EQ(::chmod(file.c_str(), 0640), 0);
  EXPECT_NE(readError(file).find("has mode 0640"), std::string::npos);
  ASSERT_EQ(::chmod(file.c_str(), 0600), 0);
  EXPECT_EQ(readError(file), "(accepted)");
}

TEST(IpmiCredentialsFile, RefusesAFileOfAnotherUser) {
  TempDir dir;
  const std::string file = dir.file("bmc.conf");
  writeWithMode(file, "user = monitor\npassword = x\n", 0600);
  // Giving a file away takes root; the file system reports another owner instead, so the test
  // runs as any user.
  const auto files = FakeFileSystem::overRealFiles();
  const uid_t other = ::geteuid() == 65534 ? 65533 : 65534;
  files->changeStatus(file, [other](struct stat& info) {
    info.st_uid = other;
    info.st_gid = other;
  });
  EXPECT_EQ(readError(file, *files), "credentials file \"" + file + "\" belongs to user " +
                                         std::to_string(other) + ", not to " +
                                         std::to_string(::geteuid()) +
                                         " (the user the provider runs as) or root");
  EXPECT_EQ(files->count(Call::Read, file), 0u) << "refused before a byte was read";
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(IpmiCredentialsFile, AFileOfRootIsAccepted) {
  TempDir dir;
  const std::string file = dir.file("bmc.conf");
  writeWithMode(file, "user = monitor\npassword = x\n", 0600);
  const auto files = FakeFileSystem::overRealFiles();
  files->changeStatus(file, [](struct stat& info) { info.st_uid = 0; });
  EXPECT_EQ(readError(file, *files), "(accepted)");
}

TEST(IpmiCredentialsFile, AFileThatCannotBeOpenedExaminedOrRead) {
  TempDir dir;
  const std::string file = dir.file("bmc.conf");
  writeWithMode(file, "user = monitor\npassword = " + kSecret + "\n", 0600);
  const auto files = FakeFileSystem::overRealFiles();
  files->fail(Call::Open, file, EACCES, 1);
  files->fail(Call::Fstat, file, EOVERFLOW, 1);
  files->fail(Call::Read, file, EIO, 1);
  const std::string prefix = "credentials file \"" + file + "\" ";
  EXPECT_EQ(readError(file, *files), prefix + "cannot be opened: Permission denied");
  EXPECT_EQ(readError(file, *files),
            prefix + "cannot be examined: Value too large for defined data type");
  EXPECT_EQ(readError(file, *files), prefix + "cannot be read: Input/output error");
  files->fail(Call::Read, file, EINTR, 1);
  EXPECT_EQ(readError(file, *files), "(accepted)") << "an interrupted read is repeated";
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(IpmiCredentialsFile, RefusesMissingRelativeOddAndHugeFiles) {
  TempDir dir;
  EXPECT_EQ(readError(dir.file("absent")), "credentials file \"" + dir.file("absent") +
                                               "\" cannot be opened: No such file or directory");
  EXPECT_EQ(readError("bmc.conf"), "credentials file \"bmc.conf\" is not an absolute path");
  EXPECT_EQ(readError(dir.path()), "credentials file \"" + dir.path() + "\" is not a regular file");
  const std::string huge = dir.file("huge");
  writeWithMode(huge, "user=a\npassword=b\n" + std::string(5000, '#'), 0600);
  EXPECT_EQ(readError(huge), "credentials file \"" + huge + "\" is larger than 4096 bytes");
}

TEST(IpmiCredentialsFile, MessagesOfABadPrivateFileNeverShowAValue) {
  TempDir dir;
  const std::string file = dir.file("bmc.conf");
  writeWithMode(file, "user = monitor\n" + kLoneSecret + "\n", 0600);
  const std::string message = readError(file);
  EXPECT_EQ(message, "credentials file \"" + file + "\" line 2 is not \"name = value\"");
}

}  // namespace
