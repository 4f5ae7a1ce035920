// The tool in-process: help, version, and every way a run ends before the library is loaded.
#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

#include "Tool.h"

namespace bluelight::cli {
namespace {

struct ToolRun {
  int exitCode;
  std::string out;
  std::string err;
};

ToolRun runWith(const std::vector<std::string>& arguments) {
  std::ostringstream out;
  std::ostringstream err;
  // No executable path: the default library is only looked for at the installed place.
  const int code = runTool(arguments, ToolIo{"", out, err});
  return {code, out.str(), err.str()};
}

TEST(Tool, HelpNamesEveryOperationOptionVariableAndExitCode) {
  const ToolRun run = runWith({"--help"});
  EXPECT_EQ(run.exitCode, 0);
  EXPECT_EQ(run.err, "");
  for (const char* text : {"Usage: bluelight-cli [options] <operation>",
                           "bluelight-cli [--json] [--library PATH] discover",
                           "  discover  ",
                           "ein, enumerate-instance-names",
                           "ei,  enumerate-instances",
                           "gi,  get-instance",
                           "ai,  associators",
                           "ain, associator-names",
                           "ri,  references",
                           "rin, reference-names",
                           "--namespace",
                           "--properties",
                           "--assoc-class",
                           "--result-class",
                           "--role",
                           "--result-role",
                           "--json",
                           "--verbose",
                           "--library",
                           "--computer-system",
                           "--no-computer-system",
                           "--upcall-failure",
                           "--help",
                           "--version",
                           "KESTA_INSTRUMENTATION",
                           "KESTA_DISCOVERY_ROOT",
                           "KESTA_SYSTEM_NAME",
                           "VNLOG_SINK",
                           "VNLOG_LEVEL",
                           "KESTA_LANGUAGE",
                           "Exit codes:",
                           "examples/sample-tree.json",
                           "../lib/libbluelightprofileprovider.so.1"}) {
    EXPECT_NE(run.out.find(text), std::string::npos) << text;
  }
  EXPECT_EQ(run.out.find('@'), std::string::npos) << "a placeholder was left in the help";
}

TEST(Tool, Version) {
  const ToolRun run = runWith({"--version"});
  EXPECT_EQ(run.exitCode, 0);
  EXPECT_EQ(run.out.rfind("bluelight-cli ", 0), 0u);
  EXPECT_NE(run.out.find("libbluelightprofileprovider.so.1"), std::string::npos);
}

TEST(Tool, UsageErrorsExitWithTwo) {
  const ToolRun run = runWith({"ei"});
  EXPECT_EQ(run.exitCode, 2);
  EXPECT_EQ(run.out, "");
  EXPECT_EQ(run.err,
            "bluelight-cli: error: enumerate-instances needs a class name\n"
            "Try 'bluelight-cli --help' for more information.\n");
}

TEST(Tool, MalformedPathIsAUsageErrorBeforeAnythingIsLoaded) {
  // The library does not exist: reaching the loading step would exit with 3.
  const ToolRun run = runWith({"gi", "KESTA_BlueLight.DeviceID=", "--library", "/nonexistent.so"});
  EXPECT_EQ(run.exitCode, 2);
  EXPECT_EQ(run.err,
            "bluelight-cli: error: malformed object path \"KESTA_BlueLight.DeviceID=\": the value "
            "of key DeviceID is missing (character 26)\n"
            "Try 'bluelight-cli --help' for more information.\n");
}

TEST(Tool, NoProviderExitsWithOneBeforeAnythingIsLoaded) {
  const ToolRun run = runWith({"ei", "KESTA_ComputerSystem", "--library", "/nonexistent.so"});
  EXPECT_EQ(run.exitCode, 1);
  EXPECT_EQ(run.err, "bluelight-cli: error: no provider serves class KESTA_ComputerSystem\n");
}

TEST(Tool, MissingLibraryExitsWithThree) {
  const ToolRun run = runWith({"ei", "KESTA_BlueLight", "--library", "/nonexistent/lib.so"});
  EXPECT_EQ(run.exitCode, 3);
  EXPECT_EQ(run.out, "");
  EXPECT_EQ(run.err,
            "bluelight-cli: error: the provider library /nonexistent/lib.so does not exist\n");
}

}  // namespace
}  // namespace bluelight::cli
