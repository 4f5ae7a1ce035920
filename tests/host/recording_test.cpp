// Recording: every call in order with its arguments as text, traces and logs, results, the
// switch for benchmarks, and the live callbacks.
#include <cmpihost/records.h>

#include <sstream>

#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;
using Args = std::vector<std::string>;

using RecordingTest = HostTest;

TEST_F(RecordingTest, CallsInOrderWithTheirArguments) {
  CMPIObjectPath* path = CMNewObjectPath(mb(), "root/cimv2", "KESTA_BlueLight", nullptr);
  CMAddKey(path, "DeviceID", "Blue Light:1", CMPI_chars);
  CMPIInstance* instance = CMNewInstance(mb(), path, nullptr);
  CMPIUint16 state = 3;
  CMSetProperty(instance, "AlarmState", &state, CMPI_uint16);
  const char* list[] = {"A", "B", nullptr};
  CMSetPropertyFilter(instance, list, nullptr);
  CMReturnInstance(request->result(), instance);
  CMReturnDone(request->result());

  const std::vector<CallRecord> calls = request->calls();
  ASSERT_EQ(calls.size(), 7u);
  EXPECT_EQ(calls[0].table, "CMPIBrokerEncFT");
  EXPECT_EQ(calls[0].function, "newObjectPath");
  EXPECT_EQ(calls[0].args, (Args{"root/cimv2", "KESTA_BlueLight"}));
  EXPECT_EQ(calls[1].table, "CMPIObjectPathFT");
  EXPECT_EQ(calls[1].function, "addKey");
  EXPECT_EQ(calls[1].args,
            (Args{"root/cimv2:KESTA_BlueLight", "DeviceID", "\"Blue Light:1\"", "CMPI_chars"}));
  EXPECT_EQ(calls[2].function, "newInstance");
  EXPECT_EQ(calls[2].args, (Args{"root/cimv2:KESTA_BlueLight.DeviceID=\"Blue Light:1\""}));
  EXPECT_EQ(calls[3].table, "CMPIInstanceFT");
  EXPECT_EQ(calls[3].args, (Args{"instance of KESTA_BlueLight", "AlarmState", "3", "CMPI_uint16"}));
  EXPECT_EQ(calls[4].function, "setPropertyFilter");
  EXPECT_EQ(calls[4].args, (Args{"instance of KESTA_BlueLight", "{A, B}", "NULL"}));
  EXPECT_EQ(calls[5].table, "CMPIResultFT");
  EXPECT_EQ(calls[5].args, (Args{"result", "instance of KESTA_BlueLight"}));
  EXPECT_EQ(calls[6].function, "returnDone");
  for (const CallRecord& call : calls) EXPECT_EQ(call.requestId, request->id());
  EXPECT_EQ(broker.calls(), calls);
  EXPECT_EQ(calls[0].toString(),
            "CMPIBrokerEncFT.newObjectPath(root/cimv2, KESTA_BlueLight) [request " +
                std::to_string(request->id()) + "]");
}

TEST_F(RecordingTest, NullsAndBrokenObjectsAreRenderedNotFollowed) {
  CMNewObjectPath(mb(), nullptr, nullptr, nullptr);
  CMPIString* broken = CMNewString(mb(), "x", nullptr);
  broken->hdl = nullptr;
  CMTraceMessage(mb(), 1, nullptr, nullptr, broken);
  CMGetCharsPtr(broken, nullptr);
  const std::vector<CallRecord> calls = request->calls();
  ASSERT_EQ(calls.size(), 4u);
  EXPECT_EQ(calls[0].args, (Args{"(null)", "(null)"}));
  EXPECT_EQ(calls[2].args, (Args{"1", "(null)", "(null)", "<CMPIString with null handle>"}));
  EXPECT_EQ(calls[3].table, "CMPIStringFT");
  EXPECT_EQ(calls[3].args, (Args{"<CMPIString with null handle>"}));
  const std::vector<TraceRecord> traces = request->traces();
  ASSERT_EQ(traces.size(), 1u);
  EXPECT_EQ(traces[0].text, std::nullopt);
}

TEST_F(RecordingTest, CallsOutsideRequestsHaveNoRequestId) {
  Broker other;
  CMNewString(other.cmpi(), "x", nullptr);
  ASSERT_EQ(other.calls().size(), 1u);
  EXPECT_EQ(other.calls()[0].requestId, 0u);
}

TEST_F(RecordingTest, HostWorkIsNotRecorded) {
  request->objectPath(ObjectPathValue("ns", "C"));
  makeString(broker, "x");
  CMPIInstance* instance = request->instance(InstanceValue(ObjectPathValue("ns", "C")));
  toInstanceValue(instance);
  EXPECT_TRUE(broker.calls().empty());
}

TEST_F(RecordingTest, SwitchingOff) {
  broker.setRecording(false);
  EXPECT_FALSE(broker.recording());
  CMNewString(mb(), "x", nullptr);
  CMTraceMessage(mb(), 1, "c", "t", nullptr);
  CMLogMessage(mb(), 1, "i", "t", nullptr);
  CMReturnDone(request->result());
  EXPECT_TRUE(broker.calls().empty());
  EXPECT_TRUE(broker.traces().empty());
  EXPECT_TRUE(broker.logs().empty());
  EXPECT_TRUE(broker.results().empty());
  EXPECT_TRUE(request->calls().empty());
  EXPECT_TRUE(request->traces().empty());
  EXPECT_EQ(request->doneCount(), 1u);
  broker.setRecording(true);
  CMNewString(mb(), "y", nullptr);
  EXPECT_EQ(broker.calls().size(), 1u);
}

TEST(RecordingOptionsTest, RecordingCanStartOff) {
  BrokerOptions options;
  options.recording = false;
  Broker broker(options);
  CMNewString(broker.cmpi(), "x", nullptr);
  EXPECT_TRUE(broker.calls().empty());
}

TEST_F(RecordingTest, ClearRecords) {
  CMNewString(mb(), "x", nullptr);
  CMTraceMessage(mb(), 1, "c", "t", nullptr);
  CMLogMessage(mb(), 1, "i", "t", nullptr);
  CMReturnDone(request->result());
  broker.clearRecords();
  EXPECT_TRUE(broker.calls().empty());
  EXPECT_TRUE(broker.traces().empty());
  EXPECT_TRUE(broker.logs().empty());
  EXPECT_TRUE(broker.results().empty());
}

TEST_F(RecordingTest, AccessorsReturnCopies) {
  CMNewString(mb(), "x", nullptr);
  std::vector<CallRecord> calls = broker.calls();
  calls.clear();
  EXPECT_EQ(broker.calls().size(), 1u);
}

TEST_F(RecordingTest, TraceCallbackSeesEveryTraceLive) {
  std::vector<TraceRecord> seen;
  broker.setTraceCallback([&](const TraceRecord& trace) { seen.push_back(trace); });
  CMTraceMessage(mb(), 2, "c", "first", nullptr);
  broker.setRecording(false);  // the callback does not depend on recording
  CMTraceMessage(mb(), 1, "c", "second", nullptr);
  ASSERT_EQ(seen.size(), 2u);
  EXPECT_EQ(seen[0].text, "first");
  EXPECT_EQ(seen[1].level, 1);
  broker.setTraceCallback(nullptr);
  CMTraceMessage(mb(), 1, "c", "third", nullptr);
  EXPECT_EQ(seen.size(), 2u);
}

TEST_F(RecordingTest, LogCallback) {
  std::vector<LogRecord> seen;
  broker.setLogCallback([&](const LogRecord& log) { seen.push_back(log); });
  CMLogMessage(mb(), CMPI_SEV_WARNING, "Id", "careful", nullptr);
  ASSERT_EQ(seen.size(), 1u);
  EXPECT_EQ(seen[0].text, "careful");
}

TEST_F(RecordingTest, CallbackMayUseTheBroker) {
  std::size_t tracesSeen = 0;
  broker.setTraceCallback([&](const TraceRecord&) { tracesSeen = broker.traces().size(); });
  CMTraceMessage(mb(), 1, "c", "t", nullptr);
  EXPECT_EQ(tracesSeen, 1u);
}

TEST_F(RecordingTest, ResultsInOrder) {
  CMPIObjectPath* path = CMNewObjectPath(mb(), "ns", "C", nullptr);
  CMReturnObjectPath(request->result(), path);
  CMReturnObjectPath(request->result(), nullptr);
  CMReturnDone(request->result());
  const std::vector<ResultEvent> results = broker.results();
  ASSERT_EQ(results.size(), 3u);
  EXPECT_EQ(results[0].toString(),
            "ObjectPath \"ns:C\" [request " + std::to_string(request->id()) + "]");
  EXPECT_EQ(results[1].state, ObjectState::NullPointer);
  EXPECT_EQ(results[2].kind, ResultKind::Done);
}

TEST(RecordTextTest, RecordsPrint) {
  TraceRecord trace;
  trace.level = 2;
  trace.component = "C";
  trace.text = "t";
  EXPECT_EQ(trace.toString(), "trace level 2 component \"C\" text \"t\"");
  LogRecord log;
  log.severity = 1;
  EXPECT_EQ(log.toString(), "log severity 1 id NULL text NULL");
  std::ostringstream out;
  out << CallRecord{"T", "f", {"a", "b"}, 0};
  EXPECT_EQ(out.str(), "T.f(a, b)");
}

}  // namespace
}  // namespace cmpihost
