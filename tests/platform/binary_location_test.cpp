// Where the binary that holds the platform's code lives.
#include <gtest/gtest.h>

#include <filesystem>

#include "os/BinaryLocation.h"

namespace {

TEST(BinaryLocation, OwnBinaryDirectoryIsTheTestsFolder) {
  const std::filesystem::path self = std::filesystem::read_symlink("/proc/self/exe");
  EXPECT_EQ(Kesta::platform::ownBinaryDirectory(), self.parent_path().string());
}

}  // namespace
