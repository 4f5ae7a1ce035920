// The convenience driver, run against the test provider library.
#include <cmpihost/driver.h>

#include "host_test_support.h"

namespace cmpihost {
namespace {

using Names = std::vector<std::string>;

class DriverTest : public ::testing::Test {
 protected:
  void SetUp() override {
    instanceLoad = createInstanceMI(library, "HostTestProvider", broker, nullptr);
    ASSERT_TRUE(instanceLoad.ok()) << instanceLoad.error;
    associationLoad = createAssociationMI(library, "HostTestProvider", broker, nullptr);
    ASSERT_TRUE(associationLoad.ok()) << associationLoad.error;
    for (const char* name : {"host1", "host2"}) {
      InstanceValue system;
      system.set("CreationClassName", "KESTA_ComputerSystem").set("Name", name);
      systems.push_back(system);
    }
    broker.setUpcallInstances("KESTA_ComputerSystem", systems);
  }

  CMPIInstanceMI* mi() const { return instanceLoad.mi; }
  CMPIAssociationMI* assoc() const { return associationLoad.mi; }

  static ObjectPathValue lightClass() { return ObjectPathValue("root/cimv2", "KESTA_BlueLight"); }
  static ObjectPathValue light(const char* id) {
    return lightClass().addKey("CreationClassName", "KESTA_BlueLight").addKey("DeviceID", id);
  }

  static Names propertyNames(const InstanceValue& instance) {
    Names names;
    for (const Property& property : instance.properties()) names.push_back(property.name);
    return names;
  }

  Broker broker;
  ProviderLibrary library{HOST_TEST_PROVIDER_PATH};
  InstanceMILoad instanceLoad;
  AssociationMILoad associationLoad;
  std::vector<InstanceValue> systems;
};

TEST_F(DriverTest, EnumerateInstanceNames) {
  const Outcome outcome = enumerateInstanceNames(broker, mi(), lightClass());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.doneCount, 1u);
  const std::vector<ObjectPathValue> paths = outcome.paths();
  ASSERT_EQ(paths.size(), 2u);
  EXPECT_EQ(paths[0], light("Blue Light:1"));
  EXPECT_EQ(paths[1], light("Blue Light:2"));
  ASSERT_EQ(outcome.results.size(), 3u);
  EXPECT_EQ(outcome.results[2].kind, ResultKind::Done);
  ASSERT_EQ(outcome.traces.size(), 1u);
  EXPECT_EQ(outcome.traces[0].component, "HostTestProvider");
  EXPECT_EQ(outcome.traces[0].text, "enumerating names");
  EXPECT_FALSE(outcome.calls.empty());
  EXPECT_EQ(outcome.calls[0].function, "trace");
  EXPECT_EQ(outcome.count(ResultKind::ObjectPath), 2u);
}

TEST_F(DriverTest, EnumerateInstancesWithEveryKindOfPropertyList) {
  const Outcome all = enumerateInstances(broker, mi(), lightClass());
  const std::vector<InstanceValue> instances = all.instances();
  ASSERT_EQ(instances.size(), 2u);
  const InstanceValue& first = instances[0];
  EXPECT_EQ(propertyNames(first),
            (Names{"CreationClassName", "DeviceID", "ElementName", "OperationalStatus", "Count"}));
  EXPECT_EQ(*first.find("OperationalStatus"), Value::array(CMPI_uint16, {Value::uint16(2)}));
  EXPECT_EQ(first.path(), light("Blue Light:1"));
  ASSERT_EQ(all.traces.size(), 1u);
  EXPECT_EQ(all.traces[0].text, "enumerating instances");
  EXPECT_TRUE(all.traces[0].textFromString);

  const Outcome keysOnly = enumerateInstances(broker, mi(), lightClass(), Names{});
  EXPECT_EQ(propertyNames(keysOnly.instances()[0]), (Names{"CreationClassName", "DeviceID"}));

  const Outcome some = enumerateInstances(broker, mi(), lightClass(), Names{"count"});
  EXPECT_EQ(propertyNames(some.instances()[0]), (Names{"CreationClassName", "DeviceID", "Count"}));
}

TEST_F(DriverTest, GetInstance) {
  const Outcome found = getInstance(broker, mi(), light("Blue Light:7"));
  EXPECT_EQ(found.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(found.instances().size(), 1u);
  EXPECT_EQ(found.instances()[0].find("DeviceID")->asString(), "Blue Light:7");

  const Outcome missing = getInstance(broker, mi(), lightClass());
  EXPECT_EQ(missing.status, StatusValue(CMPI_RC_ERR_NOT_FOUND, "no DeviceID key"));
  EXPECT_TRUE(missing.results.empty());
}

TEST_F(DriverTest, AssociatorsPassNullArgumentsThrough) {
  const Outcome outcome = associators(broker, assoc(), light("Blue Light:1"), std::nullopt,
                                      std::string("KESTA_ComputerSystem"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.instances().size(), 2u);
  EXPECT_EQ(outcome.instances()[1].find("Name")->asString(), "host2");
  ASSERT_GE(outcome.traces.size(), 2u);
  EXPECT_EQ(outcome.traces[0].component, "assocClass");
  EXPECT_EQ(outcome.traces[0].text, std::nullopt);
  EXPECT_EQ(outcome.traces[1].text, "KESTA_ComputerSystem");
}

TEST_F(DriverTest, AssociatorNames) {
  const Outcome outcome = associatorNames(broker, assoc(), light("Blue Light:1"), std::nullopt,
                                          std::nullopt, std::string("PartComponent"));
  ASSERT_EQ(outcome.paths().size(), 2u);
  EXPECT_EQ(outcome.paths()[0].findKey("Name")->asString(), "host1");
  EXPECT_EQ(outcome.traces[0].text, "PartComponent");
  EXPECT_EQ(outcome.traces[1].text, std::nullopt);
}

TEST_F(DriverTest, ReferencesAndReferenceNames) {
  const Outcome references = cmpihost::references(broker, assoc(), light("Blue Light:1"));
  const std::vector<InstanceValue> instances = references.instances();
  ASSERT_EQ(instances.size(), 2u);
  const InstanceValue& association = instances[0];
  EXPECT_EQ(association.className(), "KESTA_BlueLightSystemDevice");
  EXPECT_EQ(association.find("PartComponent")->asReference(), light("Blue Light:1"));
  EXPECT_EQ(association.path().keys().size(), 2u);

  const Outcome names = referenceNames(broker, assoc(), light("Blue Light:1"));
  ASSERT_EQ(names.paths().size(), 2u);
  EXPECT_EQ(names.paths()[0], association.path());

  const Outcome filtered = cmpihost::references(broker, assoc(), light("Blue Light:1"),
                                                std::nullopt, std::nullopt, Names{});
  EXPECT_EQ(propertyNames(filtered.instances()[0]), (Names{"GroupComponent", "PartComponent"}));
}

TEST_F(DriverTest, UpcallFailureReachesTheStatus) {
  broker.setUpcallFailure("KESTA_ComputerSystem", {CMPI_RC_ERR_ACCESS_DENIED, "denied"});
  const Outcome outcome = associatorNames(broker, assoc(), light("Blue Light:1"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_ACCESS_DENIED, "denied"));
  EXPECT_EQ(outcome.doneCount, 0u);
  ASSERT_FALSE(outcome.traces.empty());
  EXPECT_EQ(outcome.traces.back().text, "up-call failed");
}

TEST_F(DriverTest, FaultsReachTheProvider) {
  const Outcome clean = enumerateInstances(broker, mi(), lightClass());
  const std::uint64_t newInstanceCalls = broker.creationCounts()[CreatingFunction::NewInstance];
  EXPECT_EQ(newInstanceCalls, 2u);
  broker.armFault(Fault::nullResult(CreatingFunction::NewInstance, 2));
  const Outcome faulted = enumerateInstances(broker, mi(), lightClass());
  EXPECT_EQ(faulted.status.rc, CMPI_RC_ERR_FAILED);
  EXPECT_EQ(faulted.instances().size(), 1u);
  EXPECT_EQ(faulted.doneCount, 0u);
  EXPECT_EQ(faulted.traces.back().text, "cannot create an instance");
  EXPECT_EQ(clean.instances().size(), 2u);
}

TEST_F(DriverTest, EveryRequestObjectIsFreed) {
  enumerateInstances(broker, mi(), lightClass());
  cmpihost::references(broker, assoc(), light("Blue Light:1"));
  EXPECT_EQ(broker.liveObjectCount(), 0u);
}

TEST_F(DriverTest, MissingMIsAndSlots) {
  const Outcome noMI = enumerateInstances(broker, nullptr, lightClass());
  EXPECT_EQ(noMI.status.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_TRUE(noMI.status.message.has_value());

  CMPIInstanceMIFT table = *mi()->ft;
  table.getInstance = nullptr;
  CMPIInstanceMI partial{nullptr, &table};
  const Outcome noSlot = getInstance(broker, &partial, light("x"));
  EXPECT_EQ(noSlot.status,
            StatusValue(CMPI_RC_ERR_NOT_SUPPORTED, "the MI has no getInstance function"));

  CMPIAssociationMI noTable{nullptr, nullptr};
  EXPECT_EQ(associators(broker, &noTable, light("x")).status.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(DriverTest, RunForCallsTheFunctionsCannotExpress) {
  const Outcome outcome = run(broker, [&](Request& request) {
    return mi()->ft->enumerateInstanceNames(mi(), request.context(), request.result(),
                                            request.classPath("KESTA_BlueLight"));
  });
  EXPECT_EQ(outcome.paths().size(), 2u);
}

TEST_F(DriverTest, RequestOptionsReachTheContext) {
  RequestOptions options;
  options.nameSpace = "root/blue";
  const Outcome outcome = run(
      broker,
      [&](Request& request) {
        const CMPIData ns = CMGetContextEntry(request.context(), CMPIInitNameSpace, nullptr);
        EXPECT_EQ(toText(ns.value.string), "root/blue");
        return CMPIStatus{CMPI_RC_OK, nullptr};
      },
      options);
  EXPECT_EQ(outcome.status.rc, CMPI_RC_OK);
}

TEST_F(DriverTest, NotSupportedOperations) {
  const Outcome outcome = run(broker, [&](Request& request) {
    return mi()->ft->deleteInstance(mi(), request.context(), request.result(),
                                    request.objectPath(light("x")));
  });
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_NOT_SUPPORTED));
}

TEST_F(DriverTest, Cleanup) {
  EXPECT_EQ(cleanup(broker, mi()).status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(cleanup(broker, assoc(), false).status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(cleanup(broker, static_cast<CMPIInstanceMI*>(nullptr)).status.rc,
            CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(DriverTest, OutcomeRecordsOnlyItsOwnRequest) {
  enumerateInstanceNames(broker, mi(), lightClass());
  const Outcome second = enumerateInstanceNames(broker, mi(), lightClass());
  ASSERT_FALSE(second.calls.empty());
  const std::uint64_t id = second.calls[0].requestId;
  for (const CallRecord& call : second.calls) EXPECT_EQ(call.requestId, id);
  for (const ResultEvent& event : second.results) EXPECT_EQ(event.requestId, id);
  EXPECT_GT(broker.calls().size(), second.calls.size());
}

}  // namespace
}  // namespace cmpihost
