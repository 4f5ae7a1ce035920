// CMPIResult: what is handed over is recorded in order as values, also what cannot be read.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;

using ResultObjectTest = HostTest;

TEST_F(ResultObjectTest, InstancesPathsDataAndDoneInOrder) {
  const CMPIResult* result = request->result();
  CMPIInstance* instance = newInstance("root/cimv2", "KESTA_BlueLightCapabilities");
  CMSetProperty(instance, "InstanceID", "KESTA:BlueLightCapabilities1", CMPI_chars);
  CMPIObjectPath* path = newPath("root/cimv2", "KESTA_BlueLight");
  CMPIUint16 number = 5;
  EXPECT_EQ(CMReturnInstance(result, instance).rc, CMPI_RC_OK);
  EXPECT_EQ(CMReturnObjectPath(result, path).rc, CMPI_RC_OK);
  EXPECT_EQ(CMReturnData(result, &number, CMPI_uint16).rc, CMPI_RC_OK);
  EXPECT_EQ(CMReturnData(result, "text", CMPI_chars).rc, CMPI_RC_OK);
  EXPECT_EQ(CMReturnDone(result).rc, CMPI_RC_OK);

  const std::vector<ResultEvent> results = request->results();
  ASSERT_EQ(results.size(), 5u);
  EXPECT_EQ(results[0].kind, ResultKind::Instance);
  ASSERT_NE(results[0].instance(), nullptr);
  EXPECT_EQ(results[0].instance()->path().toString(),
            "root/cimv2:KESTA_BlueLightCapabilities.InstanceID=\"KESTA:BlueLightCapabilities1\"");
  EXPECT_EQ(results[1].kind, ResultKind::ObjectPath);
  ASSERT_NE(results[1].path(), nullptr);
  EXPECT_EQ(results[1].path()->className(), "KESTA_BlueLight");
  EXPECT_EQ(results[2].kind, ResultKind::Data);
  EXPECT_EQ(results[2].value, Value::uint16(5));
  EXPECT_EQ(results[3].value, Value::string("text"));
  EXPECT_EQ(results[4].kind, ResultKind::Done);
  EXPECT_EQ(request->doneCount(), 1u);
  for (const ResultEvent& event : results) EXPECT_EQ(event.requestId, request->id());
}

TEST_F(ResultObjectTest, HandedOverObjectsAreSnapshots) {
  CMPIInstance* instance = newInstance("ns", "C");
  CMSetProperty(instance, "P", "before", CMPI_chars);
  CMReturnInstance(request->result(), instance);
  CMSetProperty(instance, "P", "after", CMPI_chars);
  CMRelease(instance);
  EXPECT_EQ(request->results()[0].instance()->find("P")->asString(), "before");
}

TEST_F(ResultObjectTest, NullPointersAndNullHandlesAreRecorded) {
  const CMPIResult* result = request->result();
  CMPIInstance* broken = newInstance("ns", "C");
  broken->hdl = nullptr;
  CMPIObjectPath* brokenPath = newPath("ns", "C");
  brokenPath->hdl = nullptr;
  EXPECT_EQ(CMReturnInstance(result, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMReturnInstance(result, broken).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMReturnObjectPath(result, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMReturnObjectPath(result, brokenPath).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMReturnData(result, nullptr, CMPI_uint16).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMReturnError(result, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);

  const std::vector<ResultEvent> results = request->results();
  ASSERT_EQ(results.size(), 6u);
  EXPECT_EQ(results[0].state, ObjectState::NullPointer);
  EXPECT_EQ(results[1].state, ObjectState::NullHandle);
  EXPECT_EQ(results[2].state, ObjectState::NullPointer);
  EXPECT_EQ(results[3].state, ObjectState::NullHandle);
  EXPECT_EQ(results[4].state, ObjectState::NullPointer);
  EXPECT_EQ(results[5].kind, ResultKind::Error);
  EXPECT_EQ(results[5].state, ObjectState::NullPointer);
  for (const ResultEvent& event : results) {
    EXPECT_EQ(event.instance(), nullptr);
    EXPECT_EQ(event.path(), nullptr);
  }
}

TEST_F(ResultObjectTest, ReleaseDoesNotFreeTheRequestsResult) {
  CMPIResult* result = request->result();
  EXPECT_EQ(CMRelease(result).rc, CMPI_RC_OK);
  EXPECT_EQ(CMReturnDone(result).rc, CMPI_RC_OK);
  EXPECT_EQ(request->doneCount(), 1u);
}

TEST_F(ResultObjectTest, CloneDeliversToTheSameRequest) {
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIResult* copy = CMClone(request->result(), &rc);
  ASSERT_NE(copy, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(CMReturnDone(copy).rc, CMPI_RC_OK);
  EXPECT_EQ(request->doneCount(), 1u);
  const std::size_t before = request->liveObjectCount();
  EXPECT_EQ(CMRelease(copy).rc, CMPI_RC_OK);
  EXPECT_EQ(request->liveObjectCount(), before - 1);
}

TEST_F(ResultObjectTest, NullHandleResult) {
  CMPIResult broken = *request->result();
  broken.hdl = nullptr;
  // A copy of the struct is not one of the broker's objects; it must still fail cleanly.
  EXPECT_EQ(CMReturnDone(&broken).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(request->result()->ft->returnDone(nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(request->doneCount(), 0u);
}

TEST_F(ResultObjectTest, BrokerWideResultsFollowRecording) {
  CMReturnDone(request->result());
  EXPECT_EQ(broker.results().size(), 1u);
  broker.setRecording(false);
  CMReturnDone(request->result());
  EXPECT_EQ(broker.results().size(), 1u);
  // The request keeps its own results either way: they are the operation's output.
  EXPECT_EQ(request->doneCount(), 2u);
}

}  // namespace
}  // namespace cmpihost
