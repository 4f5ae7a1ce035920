// What goes to standard output and standard error.
#include <gtest/gtest.h>

#include <sstream>

#include "JsonFormat.h"
#include "Output.h"

namespace bluelight::cli {
namespace {

using cmpihost::InstanceValue;
using cmpihost::ObjectPathValue;
using cmpihost::ObjectState;
using cmpihost::ResultKind;
using cmpihost::StatusValue;
using cmpihost::Value;

ObjectPathValue light(const std::string& id) {
  ObjectPathValue path("root/cimv2", "KESTA_BlueLight");
  path.addKey("DeviceID", id);
  return path;
}

Report reportOf(Operation operation, const std::vector<Value>& handedOver, StatusValue status = {},
                std::size_t done = 1) {
  ProviderRun run;
  run.provider = "BlueLightProfileProvider";
  for (const Value& value : handedOver) {
    run.outcome.results.push_back(
        {value.type() == CMPI_ref ? ResultKind::ObjectPath : ResultKind::Instance,
         ObjectState::Valid, value, 1});
  }
  run.outcome.doneCount = done;
  run.outcome.status = std::move(status);
  return buildReport(operation, ObjectPathValue("root/cimv2", "KESTA_BlueLight"), {run}, false);
}

TEST(Output, InstancesAreSeparatedByABlankLine) {
  InstanceValue first(light("a"));
  first.set("DeviceID", "a");
  InstanceValue second(light("b"));
  second.set("DeviceID", "b");
  const Report report =
      reportOf(Operation::EnumerateInstances, {Value::instance(first), Value::instance(second)});
  EXPECT_EQ(resultsText(report),
            "// root/cimv2:KESTA_BlueLight.DeviceID=\"a\"\n"
            "instance of KESTA_BlueLight\n{\n    DeviceID = \"a\";\n};\n"
            "\n"
            "// root/cimv2:KESTA_BlueLight.DeviceID=\"b\"\n"
            "instance of KESTA_BlueLight\n{\n    DeviceID = \"b\";\n};\n");
}

TEST(Output, NamesOnePerLine) {
  const Report report = reportOf(Operation::EnumerateInstanceNames,
                                 {Value::reference(light("a")), Value::reference(light("b"))});
  EXPECT_EQ(
      resultsText(report),
      "root/cimv2:KESTA_BlueLight.DeviceID=\"a\"\nroot/cimv2:KESTA_BlueLight.DeviceID=\"b\"\n");
  EXPECT_EQ(resultsText(reportOf(Operation::EnumerateInstanceNames, {})), "");
}

TEST(Output, JsonIsOneDocument) {
  std::ostringstream out;
  writeResults(reportOf(Operation::EnumerateInstanceNames, {Value::reference(light("a"))}), true,
               out);
  const Json parsed = Json::parse(out.str());
  EXPECT_EQ(parsed["paths"][0], "root/cimv2:KESTA_BlueLight.DeviceID=\"a\"");
  EXPECT_EQ(out.str().back(), '\n');
}

TEST(Output, StatusAndNotes) {
  std::ostringstream ok;
  writeStatus(reportOf(Operation::GetInstance, {}, {}, 0), false, ok);
  EXPECT_EQ(ok.str(),
            "status: CMPI_RC_OK\n"
            "note: the provider returned neither an instance nor an error for this path; an "
            "object manager would answer its client with CIM_ERR_NOT_FOUND\n");

  std::ostringstream verbose;
  writeStatus(reportOf(Operation::GetInstance, {}, StatusValue(CMPI_RC_ERR_FAILED, "why"), 0), true,
              verbose);
  EXPECT_EQ(verbose.str(),
            "status: CMPI_RC_ERR_FAILED: why\n"
            "note: BlueLightProfileProvider did not signal the end of the result (no "
            "CMReturnDone)\n");

  std::ostringstream noMessage;
  writeStatus(reportOf(Operation::EnumerateInstances, {}, StatusValue(CMPI_RC_ERR_NOT_SUPPORTED)),
              false, noMessage);
  EXPECT_EQ(noMessage.str(), "status: CMPI_RC_ERR_NOT_SUPPORTED\n");
}

TEST(Output, TraceAndLogLines) {
  cmpihost::TraceRecord trace;
  trace.level = CMPI_LEV_WARNING;
  trace.component = "BlueLightProfileProvider";
  trace.text = "***No instance found***";
  EXPECT_EQ(traceLine(trace), "trace: [WARNING] BlueLightProfileProvider: ***No instance found***");
  trace.level = CMPI_LEV_INFO;
  EXPECT_EQ(traceLine(trace), "trace: [INFO] BlueLightProfileProvider: ***No instance found***");
  trace.level = 9;
  trace.component.reset();
  trace.text.reset();
  EXPECT_EQ(traceLine(trace), "trace: [level 9] (null): (null)");

  cmpihost::LogRecord log;
  log.severity = 2;
  log.id = "P";
  log.text = "t";
  EXPECT_EQ(logLine(log), "log: [severity 2] P: t");
}

}  // namespace
}  // namespace bluelight::cli
