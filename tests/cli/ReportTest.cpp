// Merging the outcomes of the providers asked into what the user is shown.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "Report.h"

namespace bluelight::cli {
namespace {

using cmpihost::InstanceValue;
using cmpihost::ObjectPathValue;
using cmpihost::ObjectState;
using cmpihost::ResultKind;
using cmpihost::StatusValue;
using cmpihost::Value;

ObjectPathValue pathOf(const std::string& className, const std::string& id) {
  ObjectPathValue path("root/cimv2", className);
  path.addKey("InstanceID", id);
  return path;
}

// A run that handed over `paths` (and instances of the same paths when `asInstances`), then
// maybe returnDone, and returned `status`.
ProviderRun run(const std::string& provider, const std::vector<ObjectPathValue>& paths,
                bool asInstances, StatusValue status = {}, std::size_t done = 1) {
  ProviderRun result;
  result.provider = provider;
  result.kind = MIKind::Association;
  for (const ObjectPathValue& path : paths) {
    if (asInstances) {
      result.outcome.results.push_back(
          {ResultKind::Instance, ObjectState::Valid, Value::instance(InstanceValue(path)), 1});
    } else {
      result.outcome.results.push_back(
          {ResultKind::ObjectPath, ObjectState::Valid, Value::reference(path), 1});
    }
  }
  for (std::size_t i = 0; i < done; ++i) {
    result.outcome.results.push_back({ResultKind::Done, ObjectState::Valid, Value(), 1});
  }
  result.outcome.doneCount = done;
  result.outcome.status = std::move(status);
  return result;
}

const ObjectPathValue kTarget = pathOf("KESTA_BlueLight", "t");

TEST(Report, MergesResultsInAskingOrder) {
  const Report report = buildReport(
      Operation::AssociatorNames, kTarget,
      {run("A", {pathOf("X", "1")}, false), run("B", {pathOf("Y", "2"), pathOf("Y", "3")}, false)},
      true);
  EXPECT_TRUE(report.status.ok());
  ASSERT_EQ(report.paths.size(), 3u);
  EXPECT_EQ(report.paths[0], pathOf("X", "1"));
  EXPECT_EQ(report.paths[2], pathOf("Y", "3"));
  EXPECT_TRUE(report.instances.empty());
  EXPECT_TRUE(report.notes.empty());
}

TEST(Report, FirstErrorWinsAndResultsAreNotShown) {
  const Report report =
      buildReport(Operation::ReferenceNames, kTarget,
                  {run("A", {pathOf("X", "1")}, false, {}, 0),
                   run("B", {}, false, StatusValue(CMPI_RC_ERR_FAILED, "first"), 0),
                   run("C", {}, false, StatusValue(CMPI_RC_ERR_NOT_FOUND, "second"), 0)},
                  true);
  EXPECT_EQ(report.status, StatusValue(CMPI_RC_ERR_FAILED, "first"));
  EXPECT_EQ(report.statusProvider, "B");
  EXPECT_TRUE(report.paths.empty());
  EXPECT_EQ(report.notes,
            (std::vector<std::string>{
                "1 result handed over by the providers is not shown: a client of an object "
                "manager only gets the error; name one association class with --assoc-class to "
                "ask only its provider"}));
  EXPECT_EQ(report.verboseNotes,
            (std::vector<std::string>{"A did not signal the end of the result (no CMReturnDone)",
                                      "B did not signal the end of the result (no CMReturnDone)",
                                      "C did not signal the end of the result (no CMReturnDone)",
                                      "the status is the one B returned"}));
}

TEST(Report, ErrorOfASingleProvider) {
  const Report report =
      buildReport(Operation::EnumerateInstances, ObjectPathValue("root/cimv2", "KESTA_BlueLight"),
                  {run("P", {pathOf("X", "1"), pathOf("X", "2")}, true,
                       StatusValue(CMPI_RC_ERR_FAILED, "array"))},
                  false);
  EXPECT_EQ(report.notes, (std::vector<std::string>{
                              "2 results handed over by the provider are not shown: a client of "
                              "an object manager only gets the error"}));
  EXPECT_TRUE(report.verboseNotes.empty());
  EXPECT_TRUE(report.instances.empty());
}

TEST(Report, GetInstanceWithoutAnswerIsPointedOut) {
  const Report report =
      buildReport(Operation::GetInstance, kTarget, {run("P", {}, true, {}, 0)}, false);
  EXPECT_TRUE(report.status.ok());
  EXPECT_EQ(report.notes,
            (std::vector<std::string>{
                "the provider returned neither an instance nor an error for this path; an object "
                "manager would answer its client with CIM_ERR_NOT_FOUND"}));
  EXPECT_EQ(report.verboseNotes,
            (std::vector<std::string>{"P did not signal the end of the result (no CMReturnDone)"}));
}

TEST(Report, GetInstanceWithTwoAnswers) {
  const Report report = buildReport(Operation::GetInstance, kTarget,
                                    {run("P", {pathOf("X", "1"), pathOf("X", "2")}, true)}, false);
  EXPECT_EQ(report.instances.size(), 2u);
  EXPECT_EQ(report.notes,
            (std::vector<std::string>{"the provider returned 2 instances for one path"}));
}

TEST(Report, UnexpectedHandOversAreNotedNotShown) {
  ProviderRun odd = run("P", {pathOf("X", "1")}, true, {}, 2);
  odd.outcome.results.push_back(
      {ResultKind::ObjectPath, ObjectState::Valid, Value::reference(pathOf("X", "2")), 1});
  odd.outcome.results.push_back({ResultKind::Instance, ObjectState::NullPointer, Value(), 1});
  odd.outcome.results.push_back({ResultKind::Instance, ObjectState::NullHandle, Value(), 1});
  odd.outcome.results.push_back({ResultKind::Data, ObjectState::Valid, Value::uint8(1), 1});
  odd.outcome.results.push_back({ResultKind::Error, ObjectState::Valid, Value(), 1});
  const Report report = buildReport(Operation::EnumerateInstances, kTarget, {odd}, false);
  EXPECT_EQ(report.instances.size(), 1u);
  EXPECT_EQ(report.notes,
            (std::vector<std::string>{
                "P handed over 2 objects that cannot be read (a null pointer or a null handle); "
                "not shown",
                "P handed over 1 object path where instances were expected; not shown",
                "P handed over 1 value with returnData; not shown"}));
  EXPECT_EQ(report.verboseNotes,
            (std::vector<std::string>{"P called returnError 1 time",
                                      "P signalled the end of the result 2 times"}));
}

TEST(Report, InstancesWhereNamesWereExpected) {
  const Report report = buildReport(Operation::EnumerateInstanceNames, kTarget,
                                    {run("P", {pathOf("X", "1")}, true)}, false);
  EXPECT_TRUE(report.paths.empty());
  EXPECT_EQ(report.notes,
            (std::vector<std::string>{
                "P handed over 1 instance where object paths were expected; not shown"}));
}

}  // namespace
}  // namespace bluelight::cli
