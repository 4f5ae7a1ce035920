// Fault injection: every fault kind on every creating function, counting, several faults at
// once, faults from the k-th call on, and disarming.
#include <functional>
#include <map>

#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;

// How to call one creating function, and how to use what it returned.
struct Creator {
  std::function<void*(CMPIStatus*)> create;
  std::function<CMPIrc(void*)> use;  // the rc of one call on the object
};

class FaultsTestBase : public HostTest {
 protected:
  Creator creatorFor(CreatingFunction function) {
    const CMPIBroker* b = mb();
    const CMPIContext* ctx = request->context();
    CMPIObjectPath* path = request->objectPath(ObjectPathValue("root/cimv2", "KESTA_BlueLight"));
    CMPIObjectPath* systems =
        request->objectPath(ObjectPathValue("root/cimv2", "KESTA_ComputerSystem"));
    CMPIInstance* instance = request->instance(InstanceValue(ObjectPathValue("ns", "C")));
    CMPIString* string = request->string("s");
    auto usePath = [](void* object) {
      CMPIStatus rc{CMPI_RC_OK, nullptr};
      CMGetKeyCount(static_cast<CMPIObjectPath*>(object), &rc);
      return rc.rc;
    };
    auto useDateTime = [](void* object) {
      CMPIStatus rc{CMPI_RC_OK, nullptr};
      CMGetBinaryFormat(static_cast<CMPIDateTime*>(object), &rc);
      return rc.rc;
    };
    auto useEnumeration = [](void* object) {
      CMPIStatus rc{CMPI_RC_OK, nullptr};
      CMHasNext(static_cast<CMPIEnumeration*>(object), &rc);
      return rc.rc;
    };
    switch (function) {
      case CreatingFunction::NewInstance:
        return {[=](CMPIStatus* rc) -> void* { return CMNewInstance(b, path, rc); },
                [](void* object) {
                  CMPIStatus rc{CMPI_RC_OK, nullptr};
                  CMGetPropertyCount(static_cast<CMPIInstance*>(object), &rc);
                  return rc.rc;
                }};
      case CreatingFunction::NewObjectPath:
        return {[=](CMPIStatus* rc) -> void* { return CMNewObjectPath(b, "ns", "C", rc); },
                usePath};
      case CreatingFunction::NewArgs:
        return {[=](CMPIStatus* rc) -> void* { return CMNewArgs(b, rc); },
                [](void* object) {
                  CMPIStatus rc{CMPI_RC_OK, nullptr};
                  CMGetArgCount(static_cast<CMPIArgs*>(object), &rc);
                  return rc.rc;
                }};
      case CreatingFunction::NewString:
        return {[=](CMPIStatus* rc) -> void* { return CMNewString(b, "text", rc); },
                [](void* object) {
                  CMPIStatus rc{CMPI_RC_OK, nullptr};
                  CMGetCharsPtr(static_cast<CMPIString*>(object), &rc);
                  return rc.rc;
                }};
      case CreatingFunction::NewArray:
        return {[=](CMPIStatus* rc) -> void* { return CMNewArray(b, 2, CMPI_uint16, rc); },
                [](void* object) {
                  CMPIStatus rc{CMPI_RC_OK, nullptr};
                  CMGetArrayCount(static_cast<CMPIArray*>(object), &rc);
                  return rc.rc;
                }};
      case CreatingFunction::NewDateTime:
        return {[=](CMPIStatus* rc) -> void* { return CMNewDateTime(b, rc); }, useDateTime};
      case CreatingFunction::NewDateTimeFromBinary:
        return {[=](CMPIStatus* rc) -> void* { return CMNewDateTimeFromBinary(b, 1, 0, rc); },
                useDateTime};
      case CreatingFunction::NewDateTimeFromChars:
        return {[=](CMPIStatus* rc) -> void* {
                  return CMNewDateTimeFromChars(b, "20240101000000.000000+000", rc);
                },
                useDateTime};
      case CreatingFunction::GetObjectPath:
        return {[=](CMPIStatus* rc) -> void* { return CMGetObjectPath(instance, rc); }, usePath};
      case CreatingFunction::Clone:
        return {[=](CMPIStatus* rc) -> void* { return CMClone(string, rc); },
                [](void* object) {
                  CMPIStatus rc{CMPI_RC_OK, nullptr};
                  CMGetCharsPtr(static_cast<CMPIString*>(object), &rc);
                  return rc.rc;
                }};
      case CreatingFunction::EnumerateInstanceNames:
        return {[=](CMPIStatus* rc) -> void* { return CBEnumInstanceNames(b, ctx, systems, rc); },
                useEnumeration};
      case CreatingFunction::EnumerateInstances:
        return {
            [=](CMPIStatus* rc) -> void* { return CBEnumInstances(b, ctx, systems, nullptr, rc); },
            useEnumeration};
    }
    return {};
  }

  // A status no broker function sets, to see whether *rc was touched.
  static CMPIStatus untouched() { return CMPIStatus{CMPI_RC_ERR_ALREADY_EXISTS, nullptr}; }
};

// ---- Every kind on every function ----

using FaultCase = std::tuple<CreatingFunction, FaultKind>;

class EveryFaultTest : public FaultsTestBase, public ::testing::WithParamInterface<FaultCase> {};

TEST_P(EveryFaultTest, TheSecondCallFailsAsArmed) {
  const auto [function, kind] = GetParam();
  const Creator creator = creatorFor(function);
  Fault fault;
  fault.function = function;
  fault.nth = 2;
  fault.kind = kind;
  fault.status = StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "injected");
  const FaultId id = broker.armFault(fault);
  const CreationCounts before = broker.creationCounts();

  CMPIStatus rc = untouched();
  void* first = creator.create(&rc);
  ASSERT_NE(first, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(creator.use(first), CMPI_RC_OK);
  EXPECT_EQ(broker.faultFireCount(id), 0u);

  rc = untouched();
  void* second = creator.create(&rc);
  EXPECT_EQ(broker.faultFireCount(id), 1u);
  switch (kind) {
    case FaultKind::NullResult:
      EXPECT_EQ(second, nullptr);
      EXPECT_EQ(rc.rc, CMPI_RC_ERR_ALREADY_EXISTS);
      break;
    case FaultKind::NullHandle:
      ASSERT_NE(second, nullptr);
      EXPECT_EQ(*static_cast<void**>(second), nullptr);  // the handle
      EXPECT_EQ(creator.use(second), CMPI_RC_ERR_INVALID_HANDLE);
      EXPECT_EQ(rc.rc, CMPI_RC_ERR_ALREADY_EXISTS);
      break;
    case FaultKind::ErrorStatus:
      EXPECT_EQ(second, nullptr);
      EXPECT_EQ(testing::statusOf(rc), StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "injected"));
      break;
    case FaultKind::InvalidateHandle:
      FAIL() << "not a creating-function fault";
  }

  // The fault fired once; the third call works again.
  rc = untouched();
  void* third = creator.create(&rc);
  ASSERT_NE(third, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(broker.faultFireCount(id), 1u);
  EXPECT_EQ(broker.creationCounts()[function], before[function] + 3);
}

TEST_P(EveryFaultTest, ANullRcPointerIsFine) {
  const auto [function, kind] = GetParam();
  Fault fault;
  fault.function = function;
  fault.kind = kind;
  broker.armFault(fault);
  void* result = creatorFor(function).create(nullptr);
  EXPECT_EQ(result == nullptr, kind != FaultKind::NullHandle);
}

std::string caseName(const ::testing::TestParamInfo<FaultCase>& info) {
  std::string name =
      std::string(toString(std::get<0>(info.param))) + "_" + toString(std::get<1>(info.param));
  return name;
}

INSTANTIATE_TEST_SUITE_P(AllCreatingFunctions, EveryFaultTest,
                         ::testing::Combine(::testing::ValuesIn(allCreatingFunctions()),
                                            ::testing::Values(FaultKind::NullResult,
                                                              FaultKind::NullHandle,
                                                              FaultKind::ErrorStatus)),
                         caseName);

// ---- Counting and combinations ----

using FaultsTest = FaultsTestBase;

TEST_F(FaultsTest, CountsEveryCreatingCall) {
  broker.resetCreationCounts();
  for (const CreatingFunction function : allCreatingFunctions()) {
    const Creator creator = creatorFor(function);
    creator.create(nullptr);
    creator.create(nullptr);
  }
  const CreationCounts counts = broker.creationCounts();
  for (const CreatingFunction function : allCreatingFunctions()) {
    EXPECT_EQ(counts[function], 2u) << function;
  }
  EXPECT_EQ(counts.total(), 2u * kCreatingFunctionCount);
  broker.resetCreationCounts();
  EXPECT_EQ(broker.creationCounts().total(), 0u);
}

TEST_F(FaultsTest, FaultedAndFailingCallsAreCountedToo) {
  broker.resetCreationCounts();
  broker.armFault(Fault::nullResult(CreatingFunction::NewString));
  CMNewString(mb(), "x", nullptr);
  CMNewString(mb(), nullptr, nullptr);
  EXPECT_EQ(broker.creationCounts()[CreatingFunction::NewString], 2u);
}

TEST_F(FaultsTest, StickyFaultFiresFromTheKthCallOn) {
  const FaultId id =
      broker.armFault(Fault::nullResult(CreatingFunction::NewString, 3).fromThenOn());
  EXPECT_NE(CMNewString(mb(), "1", nullptr), nullptr);
  EXPECT_NE(CMNewString(mb(), "2", nullptr), nullptr);
  for (int i = 0; i < 5; ++i) EXPECT_EQ(CMNewString(mb(), "n", nullptr), nullptr);
  EXPECT_EQ(broker.faultFireCount(id), 5u);
  EXPECT_TRUE(broker.disarmFault(id));
  EXPECT_NE(CMNewString(mb(), "again", nullptr), nullptr);
  EXPECT_EQ(broker.faultFireCount(id), 5u);
  EXPECT_FALSE(broker.disarmFault(12345));
}

TEST_F(FaultsTest, SeveralFaultsAtOnce) {
  const FaultId first = broker.armFault(Fault::nullResult(CreatingFunction::NewObjectPath, 1));
  const FaultId third = broker.armFault(Fault::nullHandle(CreatingFunction::NewObjectPath, 3));
  const FaultId string = broker.armFault(Fault::errorStatus(CreatingFunction::NewString, 1));
  EXPECT_EQ(CMNewObjectPath(mb(), "ns", "C", nullptr), nullptr);
  CMPIObjectPath* second = CMNewObjectPath(mb(), "ns", "C", nullptr);
  ASSERT_NE(second, nullptr);
  EXPECT_NE(second->hdl, nullptr);
  CMPIObjectPath* thirdPath = CMNewObjectPath(mb(), "ns", "C", nullptr);
  ASSERT_NE(thirdPath, nullptr);
  EXPECT_EQ(thirdPath->hdl, nullptr);
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMNewString(mb(), "x", &rc), nullptr);
  EXPECT_EQ(testing::statusOf(rc), StatusValue(CMPI_RC_ERR_FAILED));
  EXPECT_EQ(broker.faultFireCount(first), 1u);
  EXPECT_EQ(broker.faultFireCount(third), 1u);
  EXPECT_EQ(broker.faultFireCount(string), 1u);
}

TEST_F(FaultsTest, TwoFaultsOnTheSameCallTheFirstArmedWins) {
  broker.armFault(Fault::errorStatus(CreatingFunction::NewArray, 1,
                                     StatusValue(CMPI_RC_ERR_NOT_FOUND, "first")));
  const FaultId later = broker.armFault(Fault::nullHandle(CreatingFunction::NewArray, 1));
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMNewArray(mb(), 1, CMPI_uint8, &rc), nullptr);
  EXPECT_EQ(testing::statusOf(rc), StatusValue(CMPI_RC_ERR_NOT_FOUND, "first"));
  // Both were due, so both are spent.
  EXPECT_EQ(broker.faultFireCount(later), 1u);
  EXPECT_NE(CMNewArray(mb(), 1, CMPI_uint8, &rc), nullptr);
}

TEST_F(FaultsTest, CountingStartsAtArming) {
  CMNewString(mb(), "before", nullptr);
  CMNewString(mb(), "before", nullptr);
  broker.armFault(Fault::nullResult(CreatingFunction::NewString, 1));
  EXPECT_EQ(CMNewString(mb(), "first after arming", nullptr), nullptr);
}

TEST_F(FaultsTest, ClearFaults) {
  broker.armFault(Fault::nullResult(CreatingFunction::NewString, 1).fromThenOn());
  broker.clearFaults();
  EXPECT_NE(CMNewString(mb(), "x", nullptr), nullptr);
}

TEST_F(FaultsTest, NthZeroMeansTheFirstCall) {
  broker.armFault(Fault::nullResult(CreatingFunction::NewString, 0));
  EXPECT_EQ(CMNewString(mb(), "x", nullptr), nullptr);
}

TEST_F(FaultsTest, FaultedObjectsAreFreedWithTheRequest) {
  broker.armFault(Fault::nullHandle(CreatingFunction::NewInstance, 1).fromThenOn());
  const std::size_t before = broker.liveObjectCount();
  {
    Request inner(broker);
    CMPIInstance* instance = CMNewInstance(mb(), inner.classPath("C"), nullptr);
    ASSERT_NE(instance, nullptr);
    // It cannot be released through its table, so it stays with the request ...
    EXPECT_EQ(CMRelease(instance).rc, CMPI_RC_ERR_INVALID_HANDLE);
    EXPECT_GT(inner.liveObjectCount(), 2u);
  }
  // ... which frees it when it ends.
  EXPECT_EQ(broker.liveObjectCount(), before);
}

TEST_F(FaultsTest, FaultedCallsAreRecorded) {
  broker.armFault(Fault::nullResult(CreatingFunction::NewString, 1));
  CMNewString(mb(), "x", nullptr);
  ASSERT_EQ(request->calls().size(), 1u);
  EXPECT_EQ(request->calls()[0].function, "newString");
}

TEST(FaultNamesTest, Names) {
  EXPECT_STREQ(toString(CreatingFunction::EnumerateInstanceNames), "enumerateInstanceNames");
  EXPECT_STREQ(toString(FaultKind::NullHandle), "NullHandle");
  EXPECT_EQ(allCreatingFunctions().size(), kCreatingFunctionCount);
}

}  // namespace
}  // namespace cmpihost
