// Which source a cursor opens: KESTA_INSTRUMENTATION, else the configuration file, else sysfs.
#include <gtest/gtest.h>

#include <cerrno>
#include <string>
#include <vector>

#include "FakeFileSystem.h"
#include "KestaInstrumentation.h"
#include "PlatformTestSupport.h"
#include "instrumentation/InstrumentationSource.h"

namespace {

using Kesta::Instrumentation;
using Kesta::NodeLexicon;
using Kesta::platform::configuredSource;
using Kesta::platform::makeInstrumentationSource;
using Kesta::platform::setConfigurationFileForTesting;
using Kesta::platform::SourceError;
using platform_test::FakeFileSystem;
using platform_test::writeFileIn;
using testsupport::LogCapture;
using testsupport::ScopedEnv;
using testsupport::TempDir;

std::string treeWith(const std::string& path) {
  return R"({"nodes": [{"type": 26, "path": ")" + path + R"(", "description": "Blue Light"}]})";
}

std::string firstPath(Instrumentation& cursor) {
  cursor.selectNode(NodeLexicon::NODE_TYPE_BLUE_LIGHT);
  return cursor.getPathToNode();
}

// Every test gets its own configuration file path, and the default back afterwards.
class SourceSelection : public ::testing::Test {
 public:
  SourceSelection(const SourceSelection&) = delete;
  SourceSelection& operator=(const SourceSelection&) = delete;
  ~SourceSelection() override { setConfigurationFileForTesting(""); }

 protected:
  SourceSelection() { setConfigurationFileForTesting(dir_.file("instrumentation.conf")); }

  std::string configFile() const { return dir_.file("instrumentation.conf"); }

  // Opens a cursor expecting failure; returns the exception text and checks the one log line.
  std::string failureText() {
    LogCapture capture;
    std::string what = "(no exception)";
    try {
      Instrumentation cursor;
    } catch (const std::exception& error) {
      what = error.what();
    }
    EXPECT_EQ(platform_test::rawLines(capture),
              (std::vector<std::string>{"Kesta.Platform.Instrumentation\t6000\tLOG\t" + what}));
    return what;
  }

  TempDir dir_;
};

TEST_F(SourceSelection, EnvironmentVariableComesFirst) {
  writeFileIn(dir_.file("env.json"), treeWith("from-env"));
  writeFileIn(dir_.file("conf.json"), treeWith("from-conf"));
  writeFileIn(configFile(), "file:" + dir_.file("conf.json") + "\n");
  ScopedEnv source("KESTA_INSTRUMENTATION", "  file:" + dir_.file("env.json") + "  ");
  Instrumentation cursor;
  EXPECT_EQ(firstPath(cursor), "from-env");
  EXPECT_EQ(configuredSource().origin, "KESTA_INSTRUMENTATION");
}

TEST_F(SourceSelection, ConfigurationFileWhenTheVariableIsUnsetOrEmpty) {
  writeFileIn(dir_.file("conf.json"), treeWith("from-conf"));
  writeFileIn(configFile(), "  file:" + dir_.file("conf.json") + " \r\nsysfs:/ignored\n");
  for (const std::optional<std::string>& value :
       {std::optional<std::string>(), std::optional<std::string>("  ")}) {
    ScopedEnv source("KESTA_INSTRUMENTATION", value);
    Instrumentation cursor;
    EXPECT_EQ(firstPath(cursor), "from-conf");
    EXPECT_EQ(configuredSource().origin, configFile());
  }
}

TEST_F(SourceSelection, DefaultWithoutVariableOrFile) {
  ScopedEnv source("KESTA_INSTRUMENTATION", std::nullopt);
  const Kesta::platform::SourceSetting setting = configuredSource();
  EXPECT_EQ(setting.text, "auto");
  EXPECT_EQ(setting.origin, "default");
}

TEST_F(SourceSelection, AChangedVariableCountsFromTheNextCursor) {
  writeFileIn(dir_.file("one.json"), treeWith("one"));
  writeFileIn(dir_.file("two.json"), treeWith("two"));
  ScopedEnv source("KESTA_INSTRUMENTATION", "file:" + dir_.file("one.json"));
  Instrumentation first;
  ScopedEnv changed("KESTA_INSTRUMENTATION", "file:" + dir_.file("two.json"));
  Instrumentation second;
  EXPECT_EQ(firstPath(first), "one");
  EXPECT_EQ(firstPath(second), "two");
}

TEST_F(SourceSelection, UnknownSchemeIsLoggedAndThrown) {
  ScopedEnv source("KESTA_INSTRUMENTATION", "http:bmc0");
  EXPECT_EQ(failureText(),
            "Instrumentation source \"http:bmc0\" (from KESTA_INSTRUMENTATION) cannot be read: "
            "unknown kind of source (expected file:<path>, sysfs:<directory>, "
            "enclosure:[<directory>], ipmi:[<device>], ipmi-lan:<host>?credentials=<file> or "
            "redfish:https://<host>?credentials=<file>)");
}

TEST_F(SourceSelection, TextWithoutSchemeIsLoggedAndThrown) {
  ScopedEnv source("KESTA_INSTRUMENTATION", "/var/lib/tree.json");
  EXPECT_EQ(failureText(),
            "Instrumentation source \"/var/lib/tree.json\" (from KESTA_INSTRUMENTATION) cannot be "
            "read: unknown kind of source (expected file:<path>, sysfs:<directory>, "
            "enclosure:[<directory>], ipmi:[<device>], ipmi-lan:<host>?credentials=<file> or "
            "redfish:https://<host>?credentials=<file>)");
}

TEST_F(SourceSelection, FileWithoutPathIsLoggedAndThrown) {
  ScopedEnv source("KESTA_INSTRUMENTATION", "file:");
  EXPECT_EQ(failureText(),
            "Instrumentation source \"file:\" (from KESTA_INSTRUMENTATION) cannot be read: no "
            "file is named after \"file:\"");
}

TEST_F(SourceSelection, ABadSourceInTheConfigurationFileNamesTheFile) {
  ScopedEnv source("KESTA_INSTRUMENTATION", std::nullopt);
  writeFileIn(configFile(), "file:" + dir_.file("absent.json") + "\n");
  EXPECT_EQ(failureText(), "Instrumentation source \"file:" + dir_.file("absent.json") +
                               "\" (from " + configFile() +
                               ") cannot be read: No such file or directory");
}

TEST_F(SourceSelection, UnreadableConfigurationFileIsLoggedAndThrown) {
  ScopedEnv source("KESTA_INSTRUMENTATION", std::nullopt);
  std::filesystem::create_directories(configFile());
  EXPECT_EQ(failureText(), "Instrumentation configuration cannot be used: configuration file \"" +
                               configFile() + "\" cannot be read: it is a directory");
}

TEST_F(SourceSelection, AConfigurationFileThatCannotBeOpenedOrReadIsThrown) {
  ScopedEnv source("KESTA_INSTRUMENTATION", std::nullopt);
  writeFileIn(configFile(), "sysfs:/sys/class/leds\n");
  const auto files = FakeFileSystem::overRealFiles();
  files->fail(FakeFileSystem::Call::Open, configFile(), EACCES, 1);
  files->fail(FakeFileSystem::Call::Read, configFile(), EIO, 1);
  for (const std::string reason : {"Permission denied", "Input/output error"}) {
    try {
      configuredSource(*files);
      ADD_FAILURE() << "no exception for " << reason;
    } catch (const SourceError& error) {
      EXPECT_EQ(std::string(error.what()),
                "configuration file \"" + configFile() + "\" cannot be read: " + reason);
    }
  }
  const Kesta::platform::SourceSetting setting = configuredSource(*files);
  EXPECT_EQ(setting.text, "sysfs:/sys/class/leds");
  EXPECT_EQ(setting.origin, configFile());
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST_F(SourceSelection, AConfigurationFileThatIsNotThereMeansTheDefault) {
  ScopedEnv source("KESTA_INSTRUMENTATION", std::nullopt);
  FakeFileSystem files;
  EXPECT_EQ(configuredSource(files).origin, "default");
  files.addFile(configFile(), "file:/tree.json\n");
  EXPECT_EQ(configuredSource(files).text, "file:/tree.json");
  files.fail(FakeFileSystem::Call::Open, configFile(), ENOENT);
  EXPECT_EQ(configuredSource(files).text, "auto");
}

TEST_F(SourceSelection, BlankFirstLineIsLoggedAndThrown) {
  ScopedEnv source("KESTA_INSTRUMENTATION", std::nullopt);
  writeFileIn(configFile(), "   \nfile:/somewhere.json\n");
  EXPECT_EQ(failureText(),
            "Instrumentation configuration cannot be used: the first line of configuration file "
            "\"" +
                configFile() + "\" names no source");
}

TEST(SourceFactory, MakesTheNamedSources) {
  EXPECT_EQ(makeInstrumentationSource("file:/a/b.json")->name(), "file:/a/b.json");
  EXPECT_EQ(makeInstrumentationSource("sysfs:/x/leds")->name(), "sysfs:/x/leds");
  EXPECT_EQ(makeInstrumentationSource("sysfs:")->name(), "sysfs:/sys/class/leds");
  EXPECT_EQ(makeInstrumentationSource("file:relative.json")->name(), "file:relative.json");
  EXPECT_THROW(makeInstrumentationSource("File:/a"), SourceError);
  EXPECT_THROW(makeInstrumentationSource("sysfs"), SourceError);
  EXPECT_THROW(makeInstrumentationSource(""), SourceError);
}

}  // namespace
