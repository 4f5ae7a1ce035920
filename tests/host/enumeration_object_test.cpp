// CMPIEnumeration, as the enumeration up-calls return it.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;
using testing::isNull;

class EnumerationObjectTest : public HostTest {
 protected:
  void SetUp() override {
    HostTest::SetUp();
    std::vector<InstanceValue> systems;
    for (const char* name : {"host1", "host2"}) {
      InstanceValue system;
      system.set("CreationClassName", "KESTA_ComputerSystem").set("Name", name);
      systems.push_back(system);
    }
    broker.setUpcallInstances("KESTA_ComputerSystem", systems);
  }

  CMPIEnumeration* names() {
    CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
    CMPIEnumeration* enumeration = CBEnumInstanceNames(
        mb(), request->context(), newPath("root/cimv2", "KESTA_ComputerSystem"), &rc);
    EXPECT_EQ(rc.rc, CMPI_RC_OK);
    return enumeration;
  }
};

TEST_F(EnumerationObjectTest, WalkWithHasNextAndGetNext) {
  CMPIEnumeration* enumeration = names();
  ASSERT_NE(enumeration, nullptr);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  std::vector<std::string> found;
  while (CMHasNext(enumeration, &rc)) {
    EXPECT_EQ(rc.rc, CMPI_RC_OK);
    const CMPIData item = CMGetNext(enumeration, &rc);
    EXPECT_EQ(rc.rc, CMPI_RC_OK);
    ASSERT_EQ(item.type, CMPI_ref);
    found.push_back(toObjectPathValue(item.value.ref)->toString());
  }
  EXPECT_EQ(found, (std::vector<std::string>{
                       "root/cimv2:KESTA_ComputerSystem.CreationClassName=\"KESTA_ComputerSystem\","
                       "Name=\"host1\"",
                       "root/cimv2:KESTA_ComputerSystem.CreationClassName=\"KESTA_ComputerSystem\","
                       "Name=\"host2\""}));
}

TEST_F(EnumerationObjectTest, GetNextPastTheEnd) {
  CMPIEnumeration* enumeration = names();
  CMGetNext(enumeration, nullptr);
  CMGetNext(enumeration, nullptr);
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  const CMPIData past = CMGetNext(enumeration, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_TRUE(isNull(past));
  EXPECT_EQ(CMHasNext(enumeration, &rc), 0);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
}

TEST_F(EnumerationObjectTest, ToArrayHoldsEveryItem) {
  CMPIEnumeration* enumeration = names();
  CMGetNext(enumeration, nullptr);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIArray* array = CMToArray(enumeration, &rc);
  ASSERT_NE(array, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(CMGetArrayCount(array, nullptr), 2u);
  EXPECT_EQ(CMGetArrayType(array, nullptr), CMPI_ref);
}

TEST_F(EnumerationObjectTest, InstancesEnumeration) {
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIEnumeration* enumeration = CBEnumInstances(
      mb(), request->context(), newPath("root/cimv2", "KESTA_ComputerSystem"), nullptr, &rc);
  ASSERT_NE(enumeration, nullptr);
  const CMPIData item = CMGetNext(enumeration, &rc);
  ASSERT_EQ(item.type, CMPI_instance);
  EXPECT_EQ(text(CMGetProperty(item.value.inst, "Name", nullptr).value.string), "host1");
  EXPECT_EQ(CMGetArrayType(CMToArray(enumeration, nullptr), nullptr), CMPI_instance);
}

TEST_F(EnumerationObjectTest, CloneKeepsThePosition) {
  CMPIEnumeration* enumeration = names();
  CMGetNext(enumeration, nullptr);
  CMPIEnumeration* copy = CMClone(enumeration, nullptr);
  ASSERT_NE(copy, nullptr);
  const CMPIData item = CMGetNext(copy, nullptr);
  EXPECT_EQ(toObjectPathValue(item.value.ref)->findKey("Name")->asString(), "host2");
  EXPECT_EQ(CMRelease(copy).rc, CMPI_RC_OK);
  EXPECT_TRUE(CMHasNext(enumeration, nullptr));
}

TEST_F(EnumerationObjectTest, ItemsOutliveARelease) {
  // Objects handed out by getNext belong to the request, not to the enumeration.
  CMPIEnumeration* enumeration = names();
  const CMPIData item = CMGetNext(enumeration, nullptr);
  EXPECT_EQ(CMRelease(enumeration).rc, CMPI_RC_OK);
  EXPECT_EQ(text(CMGetClassName(item.value.ref, nullptr)), "KESTA_ComputerSystem");
}

TEST_F(EnumerationObjectTest, NullHandleFailsCleanly) {
  CMPIEnumeration* enumeration = names();
  enumeration->hdl = nullptr;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMHasNext(enumeration, &rc), 0);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_TRUE(isNull(CMGetNext(enumeration, &rc)));
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMToArray(enumeration, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMClone(enumeration, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMRelease(enumeration).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(enumeration->ft->hasNext(nullptr, &rc), 0);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

}  // namespace
}  // namespace cmpihost
