// KESTA_BlueLightCapabilities instances: the builder and the retrieval of the record.
#include "FactoryFixture.h"

namespace factorytest {
namespace {

using cmpihost::CreatingFunction;
using cmpihost::Fault;
using cmpihost::InstanceValue;
using cmpihost::StatusValue;
using cmpihost::Value;
using Names = std::vector<std::string>;

const Names kBoth = {"InstanceID", "RequestedAlarmStatesSupported"};
const Names kKeyOnly = {"InstanceID"};
const std::string kMakeList = " broker=PTR ref=PTR bluelightCap=PTR properties=";

Value states(const std::vector<unsigned short>& values) {
  std::vector<Value> elements;
  elements.reserve(values.size());
  for (unsigned short v : values) elements.push_back(Value::uint16(v));
  return Value::array(CMPI_uint16, elements);
}

TEST_F(FactoryTest, CapabilitiesInstanceWithBothProperties) {
  BlueLightFactory factory;
  CMPIStatus status = untouchedStatus();
  CMPIInstance* instance = factory.makeBlueLightCapabilitiesInstance(
      mb(), ref("KESTA_BlueLightCapabilities"), BlueLightCapabilities(), nullptr, false, &status);
  const InstanceValue value = snapshot(instance);
  EXPECT_EQ(propertyNames(value), kBoth);
  EXPECT_EQ(*value.find("InstanceID"), Value("KESTA:BlueLightCapabilities1"));
  EXPECT_EQ(*value.find("RequestedAlarmStatesSupported"), states({1, 2, 3}));
  EXPECT_EQ(value.path().className(), "KESTA_BlueLightCapabilities");
  EXPECT_EQ(value.path().host(), kSystemName);
  EXPECT_EQ(value.path().nameSpace(), kNameSpace);
  EXPECT_EQ(status.rc, CMPI_RC_OK);
  EXPECT_EQ(
      factoryLog(),
      (Names{entering("makeBlueLightCapabilitiesInstance", kMakeList + "0 IsObjPath=0 rc=PTR"),
             exiting("makeBlueLightCapabilitiesInstance", kMakeList + "0 IsObjPath=0 rc=PTR")}));
}

TEST_F(FactoryTest, CapabilitiesPropertyListCases) {
  struct Row {
    cmpihost::PropertyList list;
    bool isObjPath;
    Names expected;
  };
  const Row rows[] = {
      {Names{"RequestedAlarmStatesSupported"}, false, kBoth},
      {Names{"RequestedAlarmStatesSupported"}, true, kBoth},
      {Names{"ElementName"}, false, kKeyOnly},
      {Names{}, false, kKeyOnly},
      {std::nullopt, false, kBoth},
      {std::nullopt, true, kKeyOnly},
      {Names{"requestedalarmstatessupported"}, false, kKeyOnly},
      {Names{"InstanceID"}, false, kKeyOnly},
  };
  BlueLightFactory factory;
  for (const Row& row : rows) {
    const InstanceValue value = snapshot(factory.makeBlueLightCapabilitiesInstance(
        mb(), ref(), BlueLightCapabilities(), properties(row.list), row.isObjPath, nullptr));
    EXPECT_EQ(propertyNames(value), row.expected)
        << (row.list ? row.list->size() : 99) << " " << row.isObjPath;
  }
}

TEST_F(FactoryTest, CapabilitiesArrayHoldsWhatTheGetterReturns) {
  BlueLightFactory factory;
  BlueLightCapabilities used;
  used.getAlarmStatesSupported();
  const InstanceValue value = snapshot(
      factory.makeBlueLightCapabilitiesInstance(mb(), ref(), used, nullptr, false, nullptr));
  EXPECT_EQ(*value.find("RequestedAlarmStatesSupported"), states({1, 2, 3, 1, 2, 3}));
  // The caller's record is not changed: it was passed by value.
  EXPECT_EQ(used.alarmStatesSupported.size(), 3u);
}

TEST_F(FactoryTest, CapabilitiesArrayFailureKeepsTheKeyAndReportsBothTexts) {
  BlueLightFactory factory;
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  CMPIStatus status = untouchedStatus();
  CMPIInstance* instance = factory.makeBlueLightCapabilitiesInstance(
      mb(), ref(), BlueLightCapabilities(), nullptr, false, &status);
  EXPECT_EQ(propertyNames(snapshot(instance)), kKeyOnly);
  EXPECT_EQ(cmpihost::toStatusValue(status),
            StatusValue(CMPI_RC_ERR_FAILED,
                        std::string("Creating array for Property                         "
                                    "RequestedAlarmStatesSupported failed.")));
  EXPECT_EQ(brokerTraces(), (std::vector<cmpihost::TraceRecord>{
                                brokerTrace(2, "BlueLightCapabilitiesProvider",
                                            "Creating Array for Property                         "
                                            "RequestedAlarmStatesSupported failed.")}));
  // Unlike the lights, the exit line follows.
  EXPECT_EQ(factoryLog().size(), 2u);
}

TEST_F(FactoryTest, CapabilitiesArrayFailureWithNullStatus) {
  BlueLightFactory factory;
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  CMPIInstance* instance = factory.makeBlueLightCapabilitiesInstance(
      mb(), ref(), BlueLightCapabilities(), nullptr, false, nullptr);
  EXPECT_EQ(propertyNames(snapshot(instance)), kKeyOnly);
  EXPECT_EQ(brokerTraces().size(), 1u);
  for (const auto& call : broker_.calls()) EXPECT_NE(call.function, "newString");
}

TEST_F(FactoryTest, CapabilitiesInstanceWithoutHandleIsReturnedAsItIs) {
  BlueLightFactory factory;
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewInstance, 1));
  CMPIStatus status = untouchedStatus();
  CMPIInstance* instance = factory.makeBlueLightCapabilitiesInstance(
      mb(), ref(), BlueLightCapabilities(), nullptr, false, &status);
  ASSERT_NE(instance, nullptr);
  EXPECT_EQ(instance->hdl, nullptr);
  for (const auto& call : broker_.calls()) {
    EXPECT_NE(call.function, "setProperty");
    EXPECT_NE(call.function, "setPropertyFilter");
  }
  EXPECT_EQ(factoryLog().size(), 2u);
}

TEST_F(FactoryTest, CapabilitiesInstanceFailuresGiveNull) {
  BlueLightFactory factory;
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  EXPECT_EQ(factory.makeBlueLightCapabilitiesInstance(mb(), ref(), BlueLightCapabilities(), nullptr,
                                                      false, nullptr),
            nullptr);
  broker_.armFault(Fault::nullHandle(CreatingFunction::NewObjectPath, 1));
  EXPECT_EQ(factory.makeBlueLightCapabilitiesInstance(mb(), ref(), BlueLightCapabilities(), nullptr,
                                                      false, nullptr),
            nullptr);
  EXPECT_TRUE(brokerTraces().empty());
}

TEST_F(FactoryTest, CapabilitiesPathFailureLeavesTheBrokersStatus) {
  BlueLightFactory factory;
  broker_.armFault(Fault::errorStatus(
      CreatingFunction::NewObjectPath, 1,
      StatusValue(CMPI_RC_ERR_INVALID_NAMESPACE, std::string("no such namespace"))));
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.makeBlueLightCapabilitiesInstance(mb(), ref(), BlueLightCapabilities(), nullptr,
                                                      false, &status),
            nullptr);
  EXPECT_EQ(cmpihost::toStatusValue(status),
            StatusValue(CMPI_RC_ERR_INVALID_NAMESPACE, std::string("no such namespace")));
  EXPECT_EQ(factoryLog().size(), 2u);
}

// ---- Retrieval --------------------------------------------------------------------------------

const std::string kOneList = " broker=PTR ref=PTR key=PTR properties=0 instances=PTR rc=PTR";

TEST_F(FactoryTest, GetOneCapabilitiesByInstanceID) {
  BlueLightFactory factory(false, true);
  std::vector<CMPIInstance*> instances;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getOneBlueLightCapabilitiesCMPIInstance(
                mb(), ref(), text("KESTA:BlueLightCapabilities1"), nullptr, instances, &status),
            0);
  ASSERT_EQ(instances.size(), 1u);
  EXPECT_EQ(propertyNames(snapshot(instances[0])), kBoth);
  const auto log = factoryLog();
  ASSERT_EQ(log.size(), 4u);
  EXPECT_EQ(log.front(), entering("getOneBlueLightCapabilitiesCMPIInstance", kOneList));
  EXPECT_EQ(log.back(), exiting("getOneBlueLightCapabilitiesCMPIInstance", kOneList));
}

TEST_F(FactoryTest, GetOneCapabilitiesNeedsTheExactIdentifier) {
  BlueLightFactory factory(false, true);
  for (const std::string key :
       {"kesta:bluelightcapabilities1", "KESTA:BlueLightCapabilities1 ",
        " KESTA:BlueLightCapabilities1", "KESTA:BlueLightCapabilities2", ""}) {
    log_.clear();
    std::vector<CMPIInstance*> instances;
    CMPIStatus status = untouchedStatus();
    EXPECT_EQ(factory.getOneBlueLightCapabilitiesCMPIInstance(mb(), ref(), text(key), nullptr,
                                                              instances, &status),
              1)
        << key;
    EXPECT_TRUE(instances.empty());
    EXPECT_EQ(factoryLog(), (Names{entering("getOneBlueLightCapabilitiesCMPIInstance", kOneList)}));
  }
}

TEST_F(FactoryTest, GetOneCapabilitiesInALightsOnlyFactoryFindsNothing) {
  BlueLightFactory factory(true, false);
  std::vector<CMPIInstance*> instances;
  EXPECT_EQ(factory.getOneBlueLightCapabilitiesCMPIInstance(
                mb(), ref(), text("KESTA:BlueLightCapabilities1"), nullptr, instances, nullptr),
            1);
  EXPECT_EQ(factory.getOneBlueLightCapabilitiesCMPIInstance(mb(), ref(), nullptr, nullptr,
                                                            instances, nullptr),
            1);
  EXPECT_TRUE(instances.empty());
}

TEST_F(FactoryTest, GetOneCapabilitiesAlwaysBuildsTheFullInstance) {
  BlueLightFactory factory(false, true);
  std::vector<CMPIInstance*> instances;
  // With a null property list the array is set: the builder is asked with isObjPath false.
  ASSERT_EQ(factory.getOneBlueLightCapabilitiesCMPIInstance(
                mb(), ref(), text("KESTA:BlueLightCapabilities1"), nullptr, instances, nullptr),
            0);
  EXPECT_EQ(propertyNames(snapshot(instances[0])), kBoth);
  ASSERT_EQ(factory.getOneBlueLightCapabilitiesCMPIInstance(
                mb(), ref(), text("KESTA:BlueLightCapabilities1"), properties(Names{}), instances,
                nullptr),
            0);
  EXPECT_EQ(propertyNames(snapshot(instances[1])), kKeyOnly);
}

TEST_F(FactoryTest, GetAllCapabilitiesOnAnEmptyMap) {
  BlueLightFactory factory(true, false);
  log_.clear();
  std::vector<CMPIInstance*> instances(1, nullptr);
  EXPECT_EQ(factory.getAllBlueLightCapabilitiesCMPIInstances(mb(), ref(), nullptr, false, instances,
                                                             nullptr),
            0);
  EXPECT_EQ(instances.size(), 1u);
  const std::string list = " broker=PTR ref=PTR properties=0 isObjPath=0 instances=PTR rc=0";
  EXPECT_EQ(factoryLog(), (Names{entering("getAllBlueLightCapabilitiesCMPIInstances", list),
                                 exiting("getAllBlueLightCapabilitiesCMPIInstances", list)}));
}

TEST_F(FactoryTest, GetAllCapabilitiesForObjectPathsCarriesTheKeyOnly) {
  BlueLightFactory factory(false, true);
  std::vector<CMPIInstance*> instances;
  EXPECT_EQ(factory.getAllBlueLightCapabilitiesCMPIInstances(mb(), ref(), nullptr, true, instances,
                                                             nullptr),
            0);
  ASSERT_EQ(instances.size(), 1u);
  EXPECT_EQ(propertyNames(snapshot(instances[0])), kKeyOnly);
  EXPECT_EQ(factoryLog()[0],
            entering("getAllBlueLightCapabilitiesCMPIInstances",
                     " broker=PTR ref=PTR properties=0 isObjPath=1 instances=PTR rc=0"));
}

TEST_F(FactoryTest, GetAllCapabilitiesAppendsANullInstance) {
  BlueLightFactory factory(false, true);
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  std::vector<CMPIInstance*> instances;
  EXPECT_EQ(factory.getAllBlueLightCapabilitiesCMPIInstances(mb(), ref(), nullptr, false, instances,
                                                             nullptr),
            0);
  ASSERT_EQ(instances.size(), 1u);
  EXPECT_EQ(instances[0], nullptr);
}

}  // namespace
}  // namespace factorytest
