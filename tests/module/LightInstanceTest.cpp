// KESTA_BlueLight instances: the builder and the retrieval of one or all lights.
#include "FactoryFixture.h"

namespace factorytest {
namespace {

using cmpihost::CreatingFunction;
using cmpihost::Fault;
using cmpihost::InstanceValue;
using cmpihost::StatusValue;
using cmpihost::Value;
using testsupport::blueLight;
using Names = std::vector<std::string>;

const Names kAllProperties = {"CreationClassName",
                              "DeviceID",
                              "SystemCreationClassName",
                              "SystemName",
                              "Caption",
                              "Description",
                              "Name",
                              "ElementName",
                              "RequestedState",
                              "HealthState",
                              "OperationalStatus",
                              "AudibleAlarm",
                              "VisibleAlarm",
                              "MotionAlarm",
                              "AlarmState"};
const Names kKeys = {"CreationClassName", "DeviceID", "SystemCreationClassName", "SystemName"};

BlueLight record(const std::string& deviceID = "Blue Light:1.2") {
  BlueLight light;
  light.setDeviceID(deviceID);
  light.setElementName("Blue Light");
  light.setOperationalStatus(1);
  light.setHealthState(1);
  light.setRequestedState(1);
  light.setVisibleAlarm(true);
  light.setAlarmState(3);
  return light;
}

const std::string kMakeList = " broker=PTR ref=PTR bluelight=PTR properties=";

TEST_F(FactoryTest, AllFifteenPropertiesInOrderWithTheirValues) {
  BlueLightFactory factory;
  CMPIStatus status = untouchedStatus();
  CMPIInstance* instance =
      factory.makeBlueLightInstance(mb(), ref(), record(), nullptr, false, &status);
  ASSERT_NE(instance, nullptr);
  const InstanceValue value = snapshot(instance);
  EXPECT_EQ(propertyNames(value), kAllProperties);
  EXPECT_EQ(*value.find("CreationClassName"), Value("KESTA_BlueLight"));
  EXPECT_EQ(*value.find("DeviceID"), Value("Blue Light:1.2"));
  EXPECT_EQ(*value.find("SystemCreationClassName"), Value("KESTA_ComputerSystem"));
  EXPECT_EQ(*value.find("SystemName"), Value(kSystemName));
  EXPECT_EQ(*value.find("Caption"), Value("Blue Light"));
  EXPECT_EQ(*value.find("Description"), Value("Blue Light"));
  EXPECT_EQ(*value.find("Name"), Value("Blue Light"));
  EXPECT_EQ(*value.find("ElementName"), Value("Blue Light"));
  EXPECT_EQ(*value.find("RequestedState"), Value::uint16(2));
  EXPECT_EQ(*value.find("HealthState"), Value::uint16(5));
  EXPECT_EQ(*value.find("OperationalStatus"),
            Value::array(CMPI_uint16, {Value::uint16(2), Value::uint16(11)}));
  EXPECT_EQ(*value.find("AudibleAlarm"), Value::boolean(false));
  EXPECT_EQ(*value.find("VisibleAlarm"), Value::boolean(true));
  EXPECT_EQ(*value.find("MotionAlarm"), Value::boolean(false));
  EXPECT_EQ(*value.find("AlarmState"), Value::uint16(3));

  cmpihost::ObjectPathValue path(kNameSpace, "KESTA_BlueLight");
  path.setHost(kSystemName);
  EXPECT_EQ(value.path().className(), "KESTA_BlueLight");
  EXPECT_EQ(value.path().nameSpace(), kNameSpace);
  EXPECT_EQ(value.path().host(), kSystemName);
  EXPECT_EQ(status.rc, CMPI_RC_OK);

  EXPECT_EQ(factoryLog(),
            (Names{entering("makeBlueLightInstance", kMakeList + "0 isObjPath=0 rc=PTR"),
                   exiting("makeBlueLightInstance", kMakeList + "0 isObjPath=0 rc=PTR")}));
  EXPECT_EQ(factoryLog("TRACE"), factoryLog());
}

TEST_F(FactoryTest, ElementNameIsStrippedForTheThreeNameProperties) {
  BlueLightFactory factory;
  BlueLight light = record(" Blue Light:3 ");
  light.setElementName("  Rack Light\t");
  const InstanceValue value =
      snapshot(factory.makeBlueLightInstance(mb(), ref(), light, nullptr, false, nullptr));
  EXPECT_EQ(*value.find("DeviceID"), Value("Blue Light:3"));
  EXPECT_EQ(*value.find("Description"), Value("Rack Light"));
  EXPECT_EQ(*value.find("Name"), Value("Rack Light"));
  EXPECT_EQ(*value.find("ElementName"), Value("Rack Light"));
}

TEST_F(FactoryTest, KeysOnlyForAnObjectPathRequest) {
  BlueLightFactory factory;
  const InstanceValue value =
      snapshot(factory.makeBlueLightInstance(mb(), ref(), record(), nullptr, true, nullptr));
  EXPECT_EQ(propertyNames(value), kKeys);
  EXPECT_EQ(factoryLog()[0], entering("makeBlueLightInstance", kMakeList + "0 isObjPath=1 rc=0"));
}

TEST_F(FactoryTest, PropertyListSelectsKeysCaptionAndElementName) {
  BlueLightFactory factory;
  const InstanceValue value = snapshot(factory.makeBlueLightInstance(
      mb(), ref(), record(), properties(Names{"ElementName", "Caption"}), false, nullptr));
  Names expected = kKeys;
  expected.push_back("Caption");
  expected.push_back("ElementName");
  EXPECT_EQ(propertyNames(value), expected);
  EXPECT_EQ(factoryLog()[0], entering("makeBlueLightInstance", kMakeList + "PTR isObjPath=0 rc=0"));
}

TEST_F(FactoryTest, PropertyNamesAreCaseSensitive) {
  BlueLightFactory factory;
  const InstanceValue value = snapshot(factory.makeBlueLightInstance(
      mb(), ref(), record(), properties(Names{"elementname", "ALARMSTATE"}), false, nullptr));
  EXPECT_EQ(propertyNames(value), kKeys);
}

TEST_F(FactoryTest, EmptyPropertyListGivesKeysWhateverIsObjPathSays) {
  BlueLightFactory factory;
  for (bool isObjPath : {false, true}) {
    const InstanceValue value = snapshot(factory.makeBlueLightInstance(
        mb(), ref(), record(), properties(Names{}), isObjPath, nullptr));
    EXPECT_EQ(propertyNames(value), kKeys) << isObjPath;
  }
}

TEST_F(FactoryTest, RepeatedNamesInThePropertyListCountOnce) {
  BlueLightFactory factory;
  const InstanceValue value = snapshot(factory.makeBlueLightInstance(
      mb(), ref(), record(), properties(Names{"AlarmState", "AlarmState", "HealthState"}), true,
      nullptr));
  Names expected = kKeys;
  expected.push_back("HealthState");
  expected.push_back("AlarmState");
  EXPECT_EQ(propertyNames(value), expected);
}

TEST_F(FactoryTest, ThePropertyFilterIsHandedToTheBroker) {
  BlueLightFactory factory;
  factory.makeBlueLightInstance(mb(), ref(), record(), properties(Names{"Caption"}), false,
                                nullptr);
  bool filtered = false;
  for (const auto& call : broker_.calls()) {
    if (call.function != "setPropertyFilter") continue;
    filtered = true;
    ASSERT_EQ(call.args.size(), 3u);
    EXPECT_EQ(call.args[1], "{Caption}");
    EXPECT_EQ(call.args[2], "{CreationClassName, DeviceID, SystemCreationClassName, SystemName}");
  }
  EXPECT_TRUE(filtered);
}

TEST_F(FactoryTest, OperationalStatusArrayKeepsTheRecordsOrder) {
  BlueLightFactory factory;
  BlueLight light = record();
  light.operationalStatus = {3, 5, 11};
  InstanceValue value =
      snapshot(factory.makeBlueLightInstance(mb(), ref(), light, nullptr, false, nullptr));
  EXPECT_EQ(*value.find("OperationalStatus"),
            Value::array(CMPI_uint16, {Value::uint16(3), Value::uint16(5), Value::uint16(11)}));

  light.operationalStatus.clear();
  value = snapshot(factory.makeBlueLightInstance(mb(), ref(), light, nullptr, false, nullptr));
  ASSERT_NE(value.find("OperationalStatus"), nullptr);
  EXPECT_EQ(*value.find("OperationalStatus"), Value::array(CMPI_uint16, {}));
}

TEST_F(FactoryTest, ArrayFailureReturnsThePartlyBuiltInstance) {
  BlueLightFactory factory;
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  CMPIStatus status = untouchedStatus();
  CMPIInstance* instance =
      factory.makeBlueLightInstance(mb(), ref(), record(), nullptr, false, &status);
  ASSERT_NE(instance, nullptr);
  EXPECT_EQ(
      propertyNames(snapshot(instance)),
      (Names{"CreationClassName", "DeviceID", "SystemCreationClassName", "SystemName", "Caption",
             "Description", "Name", "ElementName", "RequestedState", "HealthState"}));
  EXPECT_EQ(cmpihost::toStatusValue(status),
            StatusValue(CMPI_RC_ERR_FAILED,
                        std::string("Create Array for Property                         "
                                    "OperationalStatus failed.")));
  EXPECT_EQ(brokerTraces(),
            (std::vector<cmpihost::TraceRecord>{brokerTrace(
                2, "BlueLightProfileProvider",
                "Create Array for Property Operat                        ionalStatus failed.")}));
  // The exit line is left out after an array failure.
  EXPECT_EQ(factoryLog(),
            (Names{entering("makeBlueLightInstance", kMakeList + "0 isObjPath=0 rc=PTR")}));
}

TEST_F(FactoryTest, ArrayFailureWithAPropertyListStopsAtOperationalStatus) {
  BlueLightFactory factory;
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  const InstanceValue value = snapshot(factory.makeBlueLightInstance(
      mb(), ref(), record(), properties(Names{"AlarmState", "OperationalStatus", "Name"}), false,
      nullptr));
  Names expected = kKeys;
  expected.push_back("Name");
  EXPECT_EQ(propertyNames(value), expected);
  EXPECT_EQ(brokerTraces().size(), 1u);
}

TEST_F(FactoryTest, ObjectPathFailureGivesNullSilently) {
  BlueLightFactory factory;
  for (const auto& fault : {Fault::nullResult(CreatingFunction::NewObjectPath),
                            Fault::nullHandle(CreatingFunction::NewObjectPath),
                            Fault::nullResult(CreatingFunction::NewInstance),
                            Fault::nullHandle(CreatingFunction::NewInstance)}) {
    log_.clear();
    broker_.clearRecords();
    broker_.armFault(fault);
    CMPIStatus status = untouchedStatus();
    EXPECT_EQ(factory.makeBlueLightInstance(mb(), ref(), record(), nullptr, false, &status),
              nullptr)
        << fault.function;
    EXPECT_EQ(status.rc, CMPI_RC_OK) << fault.function;  // as the namespace call left it
    EXPECT_TRUE(brokerTraces().empty());
    EXPECT_EQ(factoryLog().size(), 2u);  // entry and exit
  }
}

TEST_F(FactoryTest, CaptionIsLocalised) {
  BlueLightFactory factory;
  for (const auto& [language, caption] : std::vector<std::pair<std::string, std::string>>{
           {"en", "Blue Light"}, {"xx", "Blue Light"}}) {
    testsupport::ScopedEnv env("KESTA_LANGUAGE", language);
    const InstanceValue value = snapshot(factory.makeBlueLightInstance(
        mb(), ref(), record(), properties(Names{"Caption"}), false, nullptr));
    EXPECT_EQ(*value.find("Caption"), Value(caption)) << language;
  }
  testsupport::ScopedEnv german("KESTA_LANGUAGE", std::string("de"));
  const InstanceValue value = snapshot(factory.makeBlueLightInstance(
      mb(), ref(), record(), properties(Names{"Caption"}), false, nullptr));
  ASSERT_NE(value.find("Caption"), nullptr);
  EXPECT_NE(value.find("Caption")->asString(), "Blue Light");
  EXPECT_FALSE(value.find("Caption")->asString().empty());
}

// ---- Retrieval --------------------------------------------------------------------------------

const std::string kOneList = " broker=PTR ref=PTR key=PTR properties=0 instances=PTR rc=PTR";
const std::string kAllList = " broker=PTR ref=PTR properties=0 isObjPath=0 instances=PTRrc=PTR";

std::vector<std::string> deviceIDs(const std::vector<CMPIInstance*>& instances) {
  std::vector<std::string> ids;
  for (CMPIInstance* instance : instances) {
    const InstanceValue value = snapshot(instance);
    ids.push_back(value.find("DeviceID") ? value.find("DeviceID")->asString() : "?");
  }
  return ids;
}

TEST_F(FactoryTest, GetOneFindsTheLightByDeviceID) {
  useTree({blueLight("1"), blueLight("1.2"), blueLight("3")});
  BlueLightFactory factory(true, false);
  log_.clear();
  std::vector<CMPIInstance*> instances;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getOneBlueLightCMPIInstance(mb(), ref(), text("Blue Light:1.2"), nullptr,
                                                instances, &status),
            0);
  EXPECT_EQ(deviceIDs(instances), (Names{"Blue Light:1.2"}));
  // Full instance: the one-light retrieval never asks for keys only.
  EXPECT_EQ(snapshot(instances[0]).propertyCount(), 15u);
  const auto log = factoryLog();
  ASSERT_EQ(log.size(), 4u);
  EXPECT_EQ(log.front(), entering("getOneBlueLightCMPIInstance", kOneList));
  EXPECT_EQ(log.back(), exiting("getOneBlueLightCMPIInstance", kOneList));
}

TEST_F(FactoryTest, GetOneOfAnUnknownLightFindsNothingQuietly) {
  useTree({blueLight("1")});
  BlueLightFactory factory(true, false);
  log_.clear();
  std::vector<CMPIInstance*> instances;
  CMPIStatus status{CMPI_RC_ERR_NOT_FOUND, nullptr};
  EXPECT_EQ(factory.getOneBlueLightCMPIInstance(mb(), ref(), text("Blue Light:9"), nullptr,
                                                instances, &status),
            1);
  EXPECT_TRUE(instances.empty());
  // Reading the key is the only broker call with the status, and it succeeded.
  EXPECT_EQ(status.rc, CMPI_RC_OK);
  EXPECT_EQ(status.msg, nullptr);
  EXPECT_EQ(factoryLog(), (Names{entering("getOneBlueLightCMPIInstance", kOneList)}));
  EXPECT_TRUE(brokerTraces().empty());
}

TEST_F(FactoryTest, GetOneMatchesTheStrippedDeviceIDOnly) {
  useTree({blueLight("1.2", 1u, 2u, "  Blue Light ")});
  BlueLightFactory factory(true, false);
  std::vector<CMPIInstance*> instances;
  EXPECT_EQ(factory.getOneBlueLightCMPIInstance(mb(), ref(), text("  Blue Light :1.2"), nullptr,
                                                instances, nullptr),
            1);
  EXPECT_EQ(factory.getOneBlueLightCMPIInstance(mb(), ref(), text("Blue Light :1.2 "), nullptr,
                                                instances, nullptr),
            1);
  EXPECT_EQ(factory.getOneBlueLightCMPIInstance(mb(), ref(), text("blue light :1.2"), nullptr,
                                                instances, nullptr),
            1);
  EXPECT_TRUE(instances.empty());
  EXPECT_EQ(factory.getOneBlueLightCMPIInstance(mb(), ref(), text("Blue Light :1.2"), nullptr,
                                                instances, nullptr),
            0);
  EXPECT_EQ(instances.size(), 1u);
}

TEST_F(FactoryTest, GetOneWithoutAKeyFindsNothing) {
  useTree({blueLight("1")});
  BlueLightFactory factory(true, false);
  std::vector<CMPIInstance*> instances;
  EXPECT_EQ(factory.getOneBlueLightCMPIInstance(mb(), ref(), nullptr, nullptr, instances, nullptr),
            1);
  CMPIString noHandle{nullptr, text("x")->ft};
  EXPECT_EQ(
      factory.getOneBlueLightCMPIInstance(mb(), ref(), &noHandle, nullptr, instances, nullptr), 1);
  EXPECT_TRUE(instances.empty());
}

TEST_F(FactoryTest, GetOneAppendsANullInstanceAsItIs) {
  useTree({blueLight("1")});
  BlueLightFactory factory(true, false);
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  std::vector<CMPIInstance*> instances;
  EXPECT_EQ(factory.getOneBlueLightCMPIInstance(mb(), ref(), text("Blue Light:1"), nullptr,
                                                instances, nullptr),
            0);
  ASSERT_EQ(instances.size(), 1u);
  EXPECT_EQ(instances[0], nullptr);
}

TEST_F(FactoryTest, GetAllInDeviceIDOrder) {
  useTree({blueLight("3"), blueLight("1"), blueLight("2")});
  BlueLightFactory factory(true, false);
  log_.clear();
  std::vector<CMPIInstance*> instances;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCMPIInstances(mb(), ref(), nullptr, false, instances, &status),
            0);
  EXPECT_EQ(deviceIDs(instances), (Names{"Blue Light:1", "Blue Light:2", "Blue Light:3"}));
  const auto log = factoryLog();
  ASSERT_EQ(log.size(), 2u + 3u * 2u);
  EXPECT_EQ(log.front(), entering("getAllBlueLightCMPIInstances", kAllList));
  EXPECT_EQ(log.back(), exiting("getAllBlueLightCMPIInstances", kAllList));
}

TEST_F(FactoryTest, GetAllForObjectPathsCarriesKeysOnly) {
  useTree({blueLight("1"), blueLight("2")});
  BlueLightFactory factory(true, false);
  std::vector<CMPIInstance*> instances;
  EXPECT_EQ(factory.getAllBlueLightCMPIInstances(mb(), ref(), nullptr, true, instances, nullptr),
            0);
  ASSERT_EQ(instances.size(), 2u);
  for (CMPIInstance* instance : instances) EXPECT_EQ(propertyNames(snapshot(instance)), kKeys);
}

TEST_F(FactoryTest, GetAllOnNoLightsIsQuietSuccess) {
  useTree({});
  BlueLightFactory factory(true, false);
  log_.clear();
  std::vector<CMPIInstance*> instances;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCMPIInstances(mb(), ref(), nullptr, false, instances, &status),
            0);
  EXPECT_TRUE(instances.empty());
  EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_EQ(factoryLog(), (Names{entering("getAllBlueLightCMPIInstances", kAllList),
                                 exiting("getAllBlueLightCMPIInstances", kAllList)}));
  EXPECT_TRUE(brokerTraces().empty());
}

TEST_F(FactoryTest, GetAllKeepsNullInstancesAndAFilledStatus) {
  useTree({blueLight("1"), blueLight("2")});
  BlueLightFactory factory(true, false);
  broker_.armFault(Fault::nullResult(CreatingFunction::NewInstance, 1));
  broker_.armFault(Fault::nullResult(CreatingFunction::NewArray, 1));
  std::vector<CMPIInstance*> instances;
  CMPIStatus status = untouchedStatus();
  EXPECT_EQ(factory.getAllBlueLightCMPIInstances(mb(), ref(), nullptr, false, instances, &status),
            0);
  ASSERT_EQ(instances.size(), 2u);
  EXPECT_EQ(instances[0], nullptr);
  ASSERT_NE(instances[1], nullptr);
  EXPECT_EQ(status.rc, CMPI_RC_ERR_FAILED);
  EXPECT_FALSE(snapshot(instances[1]).has("OperationalStatus"));
}

}  // namespace
}  // namespace factorytest
