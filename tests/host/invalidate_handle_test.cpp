// Faults that take an object's handle away after it was made: which call counts, what the call
// itself still does, what later calls and results see, and how arming checks the function name.
#include <stdexcept>

#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;

class InvalidateHandleTest : public HostTest {
 protected:
  CMPIrc keyCount(CMPIObjectPath* path) {
    CMPIStatus rc{CMPI_RC_OK, nullptr};
    CMGetKeyCount(path, &rc);
    return rc.rc;
  }
};

TEST_F(InvalidateHandleTest, TheNthCallDoesItsWorkAndThenTheObjectLosesItsHandle) {
  const FaultId id =
      broker.armFault(Fault::invalidateHandle(ObjectFunction::pathSetNameSpace(), 2));
  CMPIObjectPath* first = newPath("ns", "C");
  CMPIObjectPath* second = newPath("ns", "C");

  EXPECT_EQ(testing::statusOf(CMSetNameSpace(first, "one")), StatusValue(CMPI_RC_OK));
  EXPECT_NE(first->hdl, nullptr);
  EXPECT_EQ(broker.faultFireCount(id), 0u);

  // The second call works (it returns OK) and leaves the path without a handle.
  EXPECT_EQ(testing::statusOf(CMSetNameSpace(second, "two")), StatusValue(CMPI_RC_OK));
  EXPECT_EQ(second->hdl, nullptr);
  EXPECT_EQ(broker.faultFireCount(id), 1u);

  EXPECT_EQ(keyCount(second), CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(keyCount(first), CMPI_RC_OK);

  // Spent: a third call invalidates nothing.
  CMPIObjectPath* third = newPath("ns", "C");
  EXPECT_EQ(testing::statusOf(CMSetNameSpace(third, "three")), StatusValue(CMPI_RC_OK));
  EXPECT_NE(third->hdl, nullptr);
}

TEST_F(InvalidateHandleTest, OnlyCallsOfTheNamedFunctionCount) {
  broker.armFault(Fault::invalidateHandle(ObjectFunction::pathAddKey(), 1));
  CMPIObjectPath* path = newPath("ns", "C");
  CMSetNameSpace(path, "ns2");
  CMSetHostname(path, "host");
  EXPECT_NE(path->hdl, nullptr);

  CMPIValue value;
  value.uint16 = 7;
  EXPECT_EQ(testing::statusOf(CMAddKey(path, "K", &value, CMPI_uint16)), StatusValue(CMPI_RC_OK));
  EXPECT_EQ(path->hdl, nullptr);
}

TEST_F(InvalidateHandleTest, CallsOnObjectsWithoutAHandleAreNotCounted) {
  broker.armFault(Fault::invalidateHandle(ObjectFunction::pathSetHostname(), 1));
  CMPIObjectPath* first = newPath("ns", "C");
  CMSetHostname(first, "a");
  ASSERT_EQ(first->hdl, nullptr);

  // A failing call on the handle-less path does not use up a later fault.
  const FaultId id = broker.armFault(Fault::invalidateHandle(ObjectFunction::pathSetHostname(), 1));
  EXPECT_EQ(CMSetHostname(first, "b").rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(broker.faultFireCount(id), 0u);
  CMPIObjectPath* second = newPath("ns", "C");
  CMSetHostname(second, "c");
  EXPECT_EQ(second->hdl, nullptr);
  EXPECT_EQ(broker.faultFireCount(id), 1u);
}

TEST_F(InvalidateHandleTest, FromThenOnEveryLaterCallInvalidates) {
  const FaultId id = broker.armFault(
      Fault::invalidateHandle(ObjectFunction("CMPIInstanceFT", "setProperty"), 2).fromThenOn());
  CMPIValue value;
  value.uint16 = 1;
  CMPIInstance* instances[3] = {newInstance("ns", "C"), newInstance("ns", "C"),
                                newInstance("ns", "C")};
  for (CMPIInstance* instance : instances) CMSetProperty(instance, "P", &value, CMPI_uint16);
  EXPECT_NE(instances[0]->hdl, nullptr);
  EXPECT_EQ(instances[1]->hdl, nullptr);
  EXPECT_EQ(instances[2]->hdl, nullptr);
  EXPECT_EQ(broker.faultFireCount(id), 2u);
  EXPECT_TRUE(broker.disarmFault(id));
}

TEST_F(InvalidateHandleTest, AResultRecordsTheObjectAsHavingANullHandle) {
  broker.armFault(Fault::invalidateHandle(ObjectFunction::pathSetNameSpace(), 1));
  CMPIObjectPath* path = newPath("ns", "C");
  CMSetNameSpace(path, "root/cimv2");
  CMReturnObjectPath(request->result(), path);

  const std::vector<ResultEvent> results = request->results();
  ASSERT_EQ(results.size(), 1u);
  EXPECT_EQ(results[0].kind, ResultKind::ObjectPath);
  EXPECT_EQ(results[0].state, ObjectState::NullHandle);
  EXPECT_EQ(results[0].path(), nullptr);
}

TEST_F(InvalidateHandleTest, CreatingFunctionsAreNotCountedByIt) {
  const FaultId id =
      broker.armFault(Fault::invalidateHandle(ObjectFunction::pathSetNameSpace(), 1));
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  CMPIObjectPath* path = CMNewObjectPath(mb(), "ns", "C", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_NE(path->hdl, nullptr);
  EXPECT_EQ(broker.faultFireCount(id), 0u);
}

TEST_F(InvalidateHandleTest, ArmingNeedsAFunctionThatExistsAndIsNotRelease) {
  EXPECT_THROW(broker.armFault(Fault::invalidateHandle(ObjectFunction("CMPIObjectPathFT", "nope"))),
               std::invalid_argument);
  EXPECT_THROW(
      broker.armFault(Fault::invalidateHandle(ObjectFunction("CMPIObjectPathFT", "release"))),
      std::invalid_argument);
  EXPECT_THROW(broker.armFault(Fault::invalidateHandle(ObjectFunction("CMPINoSuchFT", "clone"))),
               std::invalid_argument);
  EXPECT_THROW(
      broker.armFault(Fault::invalidateHandle(ObjectFunction("cmpiobjectpathft", "addKey"))),
      std::invalid_argument);
  EXPECT_NO_THROW(
      broker.armFault(Fault::invalidateHandle(ObjectFunction("CMPIResultFT", "returnDone"))));
}

TEST(ObjectFunctionTest, EveryListedFunctionIsValidAndNamedTableDotSlot) {
  const std::vector<ObjectFunction>& all = allObjectFunctions();
  EXPECT_EQ(all.size(), 2u + 5u + 18u + 9u + 4u + 6u + 5u + 5u + 4u);
  for (const ObjectFunction& function : all) {
    EXPECT_TRUE(function.valid()) << function;
    EXPECT_NE(function.function, "release");
  }
  EXPECT_EQ(ObjectFunction::pathSetNameSpace().toString(), "CMPIObjectPathFT.setNameSpace");
  EXPECT_EQ(ObjectFunction::pathSetHostname(), ObjectFunction("CMPIObjectPathFT", "setHostname"));
  EXPECT_NE(ObjectFunction::pathAddKey(), ObjectFunction("CMPIObjectPathFT", "getKey"));
  EXPECT_STREQ(toString(FaultKind::InvalidateHandle), "InvalidateHandle");
}

}  // namespace
}  // namespace cmpihost
