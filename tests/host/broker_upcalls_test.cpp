// CMPIBrokerFT: the enumeration up-calls answered from configuration, configured failures, and
// the up-calls the host does not support.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;
using testing::isNull;

class BrokerUpcallsTest : public HostTest {
 protected:
  static InstanceValue system(const char* name) {
    InstanceValue instance;
    instance.set("CreationClassName", "KESTA_ComputerSystem")
        .set("Name", name)
        .set("ElementName", std::string("System ") + name);
    return instance;
  }

  std::vector<Value> drain(CMPIEnumeration* enumeration) {
    std::vector<Value> items;
    while (CMHasNext(enumeration, nullptr))
      items.push_back(toValue(CMGetNext(enumeration, nullptr)));
    return items;
  }

  CMPIObjectPath* systemClass(const char* nameSpace = "root/cimv2") {
    return newPath(nameSpace, "KESTA_ComputerSystem");
  }
};

TEST_F(BrokerUpcallsTest, NamesAreThePathsInTheRequestedNamespace) {
  broker.setUpcallInstances("KESTA_ComputerSystem", {system("host1"), system("host2")});
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIEnumeration* enumeration =
      CBEnumInstanceNames(mb(), request->context(), systemClass("root/blue"), &rc);
  ASSERT_NE(enumeration, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  const std::vector<Value> items = drain(enumeration);
  ASSERT_EQ(items.size(), 2u);
  EXPECT_EQ(items[0].type(), CMPI_ref);
  EXPECT_EQ(items[0].asReference().toString(),
            "root/blue:KESTA_ComputerSystem.CreationClassName=\"KESTA_ComputerSystem\","
            "Name=\"host1\"");
  EXPECT_EQ(items[1].asReference().findKey("Name")->asString(), "host2");
}

TEST_F(BrokerUpcallsTest, ConfiguredNamespaceAndKeysAreKept) {
  InstanceValue own = system("host1");
  own.path().setNameSpace("root/own").setHost("h").addKey("Name", "explicit");
  broker.setUpcallInstances("KESTA_ComputerSystem", {own});
  const std::vector<Value> items =
      drain(CBEnumInstanceNames(mb(), request->context(), systemClass(), nullptr));
  ASSERT_EQ(items.size(), 1u);
  EXPECT_EQ(items[0].asReference().toString(),
            "//h/root/own:KESTA_ComputerSystem.Name=\"explicit\"");
}

TEST_F(BrokerUpcallsTest, InstancesCarryTheirPropertiesAndPath) {
  broker.setUpcallInstances("KESTA_ComputerSystem", {system("host1")});
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIEnumeration* enumeration =
      CBEnumInstances(mb(), request->context(), systemClass(), nullptr, &rc);
  ASSERT_NE(enumeration, nullptr);
  const std::vector<Value> items = drain(enumeration);
  ASSERT_EQ(items.size(), 1u);
  const InstanceValue& instance = items[0].asInstance();
  EXPECT_EQ(instance.propertyCount(), 3u);
  EXPECT_EQ(instance.path().toString(),
            "root/cimv2:KESTA_ComputerSystem.CreationClassName=\"KESTA_ComputerSystem\","
            "Name=\"host1\"");
}

TEST_F(BrokerUpcallsTest, PropertyListFiltersInstances) {
  broker.setUpcallInstances("KESTA_ComputerSystem", {system("host1")});
  const char* properties[] = {"elementname", nullptr};
  const std::vector<Value> items =
      drain(CBEnumInstances(mb(), request->context(), systemClass(), properties, nullptr));
  ASSERT_EQ(items.size(), 1u);
  const InstanceValue& instance = items[0].asInstance();
  // The listed property and the key properties, so that the instance keeps its name.
  ASSERT_EQ(instance.propertyCount(), 3u);
  EXPECT_EQ(instance.properties()[0].name, "CreationClassName");
  EXPECT_EQ(instance.properties()[2].name, "ElementName");
  EXPECT_EQ(instance.path().keys().size(), 2u);
  const char* none[] = {nullptr};
  const std::vector<Value> keysOnly =
      drain(CBEnumInstances(mb(), request->context(), systemClass(), none, nullptr));
  EXPECT_EQ(keysOnly[0].asInstance().propertyCount(), 2u);
}

TEST_F(BrokerUpcallsTest, ClassesAreMatchedIgnoringCase) {
  broker.setUpcallInstances("kesta_computersystem", {system("host1")});
  EXPECT_EQ(drain(CBEnumInstanceNames(mb(), request->context(), systemClass(), nullptr)).size(),
            1u);
}

TEST_F(BrokerUpcallsTest, UnconfiguredClassesAreEmpty) {
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIEnumeration* enumeration =
      CBEnumInstanceNames(mb(), request->context(), newPath("ns", "Nothing"), &rc);
  ASSERT_NE(enumeration, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(CMHasNext(enumeration, nullptr), 0);
}

TEST_F(BrokerUpcallsTest, ConfiguredFailure) {
  broker.setUpcallInstances("KESTA_ComputerSystem", {system("host1")});
  broker.setUpcallFailure("KESTA_ComputerSystem", {CMPI_RC_ERR_ACCESS_DENIED, "not allowed"});
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CBEnumInstanceNames(mb(), request->context(), systemClass(), &rc), nullptr);
  EXPECT_EQ(testing::statusOf(rc), StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "not allowed"));
  rc = CMPIStatus{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CBEnumInstances(mb(), request->context(), systemClass(), nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_ACCESS_DENIED);
  // Without a message the status has none either.
  broker.setUpcallFailure("KESTA_ComputerSystem", StatusValue(CMPI_RC_ERR_FAILED));
  CBEnumInstanceNames(mb(), request->context(), systemClass(), &rc);
  EXPECT_EQ(rc.msg, nullptr);
  // A null rc is fine: the call still returns null.
  EXPECT_EQ(CBEnumInstanceNames(mb(), request->context(), systemClass(), nullptr), nullptr);
  broker.clearUpcall("KESTA_ComputerSystem");
  EXPECT_NE(CBEnumInstanceNames(mb(), request->context(), systemClass(), &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
}

TEST_F(BrokerUpcallsTest, ClearUpcallsForgetsEverything) {
  broker.setUpcallFailure("A", StatusValue(CMPI_RC_ERR_FAILED));
  broker.setUpcallInstances("B", {system("x")});
  broker.clearUpcalls();
  EXPECT_NE(CBEnumInstanceNames(mb(), request->context(), newPath("ns", "A"), nullptr), nullptr);
  EXPECT_EQ(
      drain(CBEnumInstanceNames(mb(), request->context(), newPath("ns", "B"), nullptr)).size(), 0u);
}

TEST_F(BrokerUpcallsTest, BadPaths) {
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CBEnumInstanceNames(mb(), request->context(), nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  CMPIObjectPath* broken = systemClass();
  broken->hdl = nullptr;
  EXPECT_EQ(CBEnumInstances(mb(), request->context(), broken, nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  // A null context is accepted: the host does not need it.
  EXPECT_NE(CBEnumInstanceNames(mb(), nullptr, systemClass(), &rc), nullptr);
}

TEST_F(BrokerUpcallsTest, UnsupportedUpcalls) {
  const CMPIContext* ctx = request->context();
  CMPIObjectPath* path = systemClass();
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  auto expectNotSupported = [&](const CMPIStatus& status) {
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
  };
  EXPECT_EQ(CBGetInstance(mb(), ctx, path, nullptr, &rc), nullptr);
  expectNotSupported(rc);
  EXPECT_EQ(CBCreateInstance(mb(), ctx, path, newInstance("ns", "C"), &rc), nullptr);
  expectNotSupported(rc);
  expectNotSupported(CBModifyInstance(mb(), ctx, path, newInstance("ns", "C"), nullptr));
  expectNotSupported(CBDeleteInstance(mb(), ctx, path));
  EXPECT_EQ(CBExecQuery(mb(), ctx, path, "SELECT * FROM C", "WQL", &rc), nullptr);
  expectNotSupported(rc);
  EXPECT_EQ(CBAssociators(mb(), ctx, path, nullptr, nullptr, nullptr, nullptr, nullptr, &rc),
            nullptr);
  expectNotSupported(rc);
  EXPECT_EQ(CBAssociatorNames(mb(), ctx, path, nullptr, nullptr, nullptr, nullptr, &rc), nullptr);
  expectNotSupported(rc);
  EXPECT_EQ(CBReferences(mb(), ctx, path, nullptr, nullptr, nullptr, &rc), nullptr);
  expectNotSupported(rc);
  EXPECT_EQ(CBReferenceNames(mb(), ctx, path, nullptr, nullptr, &rc), nullptr);
  expectNotSupported(rc);
  EXPECT_TRUE(isNull(CBInvokeMethod(mb(), ctx, path, "M", nullptr, nullptr, &rc)));
  expectNotSupported(rc);
  CMPIUint8 value = 1;
  expectNotSupported(CBSetProperty(mb(), ctx, path, "P", &value, CMPI_uint8));
  EXPECT_TRUE(isNull(CBGetProperty(mb(), ctx, path, "P", &rc)));
  expectNotSupported(rc);
  expectNotSupported(CBDeliverIndication(mb(), ctx, "ns", newInstance("ns", "Ind")));
}

TEST_F(BrokerUpcallsTest, ThreadAttachment) {
  CMPIContext* context = CBPrepareAttachThread(mb(), request->context());
  ASSERT_NE(context, nullptr);
  EXPECT_EQ(CMGetContextEntryCount(context, nullptr), 3u);
  // It belongs to the broker, because the thread may outlive the request.
  EXPECT_EQ(broker.brokerOwnedObjectCount(), 1u);
  EXPECT_EQ(CBAttachThread(mb(), context).rc, CMPI_RC_OK);
  EXPECT_EQ(CBDetachThread(mb(), context).rc, CMPI_RC_OK);
  EXPECT_EQ(broker.brokerOwnedObjectCount(), 0u);
  EXPECT_EQ(mb()->bft->attachThread(nullptr, nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

}  // namespace
}  // namespace cmpihost
