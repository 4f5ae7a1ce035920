// The example /etc/kesta/instrumentation.conf, read by the platform exactly as the provider reads
// the installed file. The package installs it on every host, so it must name a source the
// platform accepts and must not change what a host without the file would do.
#include <gtest/gtest.h>

#include <sstream>
#include <string>

#include "DeployFiles.h"
#include "TestSupport.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/SourceList.h"

namespace {

namespace platform = Kesta::platform;

class ConfigExampleTest : public ::testing::Test {
 public:
  ConfigExampleTest(const ConfigExampleTest&) = delete;
  ConfigExampleTest& operator=(const ConfigExampleTest&) = delete;
  ~ConfigExampleTest() override { platform::setConfigurationFileForTesting(""); }

 protected:
  ConfigExampleTest() : variable_("KESTA_INSTRUMENTATION", std::nullopt) {
    platform::setConfigurationFileForTesting(BLUELIGHT_DEPLOY_CONFIG_EXAMPLE);
  }

  testsupport::ScopedEnv variable_;
};

TEST_F(ConfigExampleTest, ThePlatformReadsTheFirstLineAsTheSource) {
  const platform::SourceSetting setting = platform::configuredSource();
  EXPECT_EQ(setting.origin, BLUELIGHT_DEPLOY_CONFIG_EXAMPLE);
  EXPECT_EQ(setting.text, "auto");
  EXPECT_TRUE(platform::isSourceList(setting.text));
}

TEST_F(ConfigExampleTest, InstallingItChangesNothing) {
  EXPECT_EQ(platform::configuredSource().text, platform::kDefaultSourceText);
}

TEST_F(ConfigExampleTest, EveryLaterLineIsAComment) {
  std::istringstream in(deploy::readText(BLUELIGHT_DEPLOY_CONFIG_EXAMPLE));
  std::string line;
  std::getline(in, line);
  for (int number = 2; std::getline(in, line); ++number) {
    EXPECT_TRUE(line.empty() || line[0] == '#') << "line " << number << ": " << line;
  }
}

TEST_F(ConfigExampleTest, TheVariableStillTakesPrecedence) {
  testsupport::ScopedEnv variable("KESTA_INSTRUMENTATION", std::string("file:/tmp/tree.json"));
  EXPECT_EQ(platform::configuredSource().text, "file:/tmp/tree.json");
}

}  // namespace
