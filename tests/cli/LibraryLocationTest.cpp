// Where the tool looks for the provider library.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <fstream>

#include "LibraryLocation.h"

namespace bluelight::cli {
namespace {

TEST(LibraryLocation, NextToTheToolFirstThenInstalled) {
  const std::vector<std::string> candidates = libraryCandidates("/opt/kesta/bin/bluelight-cli");
  ASSERT_GE(candidates.size(), 2u);
  EXPECT_EQ(candidates.front(), "/opt/kesta/lib/libbluelightprofileprovider.so.1");
  EXPECT_NE(std::find(candidates.begin(), candidates.end(),
                      "/opt/kesta/" BLUELIGHT_CLI_TEST_INSTALL_LIBDIR
                      "/cmpi/libbluelightprofileprovider.so.1"),
            candidates.end());
  EXPECT_EQ(candidates.back(), BLUELIGHT_CLI_TEST_INSTALLED_LIBRARY);
}

TEST(LibraryLocation, WithoutTheToolsPathOnlyTheInstalledPlace) {
  EXPECT_EQ(libraryCandidates(""), std::vector<std::string>{BLUELIGHT_CLI_TEST_INSTALLED_LIBRARY});
}

TEST(LibraryLocation, TheConfiguredLayoutIsTheBuildsOwn) {
  const InstallLayout layout = configuredLayout();
  EXPECT_EQ(layout.libDir, BLUELIGHT_CLI_TEST_INSTALL_LIBDIR);
  EXPECT_EQ(layout.providerDir, BLUELIGHT_CLI_TEST_PROVIDER_DIR);
  EXPECT_EQ(layout.installedLibrary, BLUELIGHT_CLI_TEST_INSTALLED_LIBRARY);
}

TEST(LibraryLocation, ARelativeProviderDirectoryIsLookedForUnderTheToolsPrefix) {
  const InstallLayout layout{"lib", "lib/cmpi-providers",
                             "/usr/lib/cmpi-providers/libbluelightprofileprovider.so.1"};
  const std::vector<std::string> expected = {
      "/opt/kesta/lib/libbluelightprofileprovider.so.1",
      "/opt/kesta/lib/cmpi-providers/libbluelightprofileprovider.so.1",
      "/opt/kesta/lib/cmpi/libbluelightprofileprovider.so.1",
      "/usr/lib/cmpi-providers/libbluelightprofileprovider.so.1"};
  EXPECT_EQ(libraryCandidates("/opt/kesta/bin/bluelight-cli", layout), expected);
}

TEST(LibraryLocation, AnAbsoluteProviderDirectoryIsLookedForWhereItIs) {
  const InstallLayout layout{"lib/x86_64-linux-gnu", "/srv/cimom/providers",
                             "/srv/cimom/providers/libbluelightprofileprovider.so.1"};
  const std::vector<std::string> expected = {
      "/opt/kesta/lib/libbluelightprofileprovider.so.1",
      "/opt/kesta/lib/x86_64-linux-gnu/libbluelightprofileprovider.so.1",
      "/opt/kesta/lib/x86_64-linux-gnu/cmpi/libbluelightprofileprovider.so.1",
      "/srv/cimom/providers/libbluelightprofileprovider.so.1"};
  EXPECT_EQ(libraryCandidates("/opt/kesta/bin/bluelight-cli", layout), expected);
}

TEST(LibraryLocation, AToolInTheBuildTreeFindsTheLibraryBesideIt) {
  const InstallLayout layout{"lib", "lib/cmpi",
                             "/usr/local/lib/cmpi/libbluelightprofileprovider.so.1"};
  const std::vector<std::string> candidates =
      libraryCandidates("/src/build/bin/bluelight-cli", layout);
  ASSERT_FALSE(candidates.empty());
  EXPECT_EQ(candidates.front(), "/src/build/lib/libbluelightprofileprovider.so.1");
  // lib/ and lib/cmpi/ are each listed once, however many rules name them.
  EXPECT_EQ(candidates.size(), 3u);
}

TEST(LibraryLocation, FirstExistingFile) {
  const std::string file = ::testing::TempDir() + "bluelight-cli-location-test.so";
  std::ofstream(file) << "x";
  EXPECT_EQ(firstExisting({"/nonexistent/a.so", ::testing::TempDir(), file}), file);
  EXPECT_FALSE(firstExisting({"/nonexistent/a.so"}).has_value());
  std::remove(file.c_str());
}

TEST(LibraryLocation, CurrentExecutableIsFound) {
  const std::string self = currentExecutablePath("ignored");
  EXPECT_NE(self.find("cli_unit_test"), std::string::npos) << self;
}

}  // namespace
}  // namespace bluelight::cli
