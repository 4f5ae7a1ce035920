// Conversions between CMPI objects and values, for objects of this host and of another broker.
#include <cmpihost/convert.h>

#include <cstring>

#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;

// ---- A minimal foreign broker's objects, read only through their tables ----------------------

CMPIStatus foreignRelease(CMPIString*) { return CMPIStatus{CMPI_RC_OK, nullptr}; }
CMPIString* foreignClone(const CMPIString*, CMPIStatus*) { return nullptr; }
char* foreignGetCharPtr(const CMPIString* s, CMPIStatus*) { return static_cast<char*>(s->hdl); }
CMPIStringFT foreignStringTable = {200, foreignRelease, foreignClone, foreignGetCharPtr};

struct ForeignPath {
  CMPIObjectPath cmpi;
  CMPIString nameSpace;
  CMPIString className;
  CMPIString keyName;
  CMPIString host;
};

ForeignPath* foreignOf(const CMPIObjectPath* path) {
  return reinterpret_cast<ForeignPath*>(const_cast<CMPIObjectPath*>(path));
}
CMPIString* pathNameSpace(const CMPIObjectPath* p, CMPIStatus*) { return &foreignOf(p)->nameSpace; }
CMPIString* pathHost(const CMPIObjectPath* p, CMPIStatus*) { return &foreignOf(p)->host; }
CMPIString* pathClassName(const CMPIObjectPath* p, CMPIStatus*) { return &foreignOf(p)->className; }
CMPICount pathKeyCount(const CMPIObjectPath*, CMPIStatus*) { return 1; }
CMPIData pathKeyAt(const CMPIObjectPath* p, CMPICount, CMPIString** name, CMPIStatus*) {
  if (name != nullptr) *name = &foreignOf(p)->keyName;
  CMPIData data{};
  data.type = CMPI_uint16;
  data.state = CMPI_keyValue;
  data.value.uint16 = 42;
  return data;
}

CMPIObjectPathFT makeForeignPathTable() {
  CMPIObjectPathFT table{};
  table.ftVersion = 200;
  table.getNameSpace = pathNameSpace;
  table.getHostname = pathHost;
  table.getClassName = pathClassName;
  table.getKeyCount = pathKeyCount;
  table.getKeyAt = pathKeyAt;
  return table;
}
CMPIObjectPathFT foreignPathTable = makeForeignPathTable();

ForeignPath makeForeignPath() {
  static char ns[] = "root/other";
  static char cls[] = "Foreign_Class";
  static char key[] = "Id";
  static char host[] = "far";
  ForeignPath path{};
  path.cmpi = CMPIObjectPath{&path, &foreignPathTable};
  path.nameSpace = CMPIString{ns, &foreignStringTable};
  path.className = CMPIString{cls, &foreignStringTable};
  path.keyName = CMPIString{key, &foreignStringTable};
  path.host = CMPIString{host, &foreignStringTable};
  return path;
}

// ---- Tests -----------------------------------------------------------------------------------

using ConvertTest = HostTest;

TEST_F(ConvertTest, SnapshotsOfNullPointersAndNullHandles) {
  EXPECT_FALSE(toText(nullptr));
  EXPECT_FALSE(toObjectPathValue(nullptr));
  EXPECT_FALSE(toInstanceValue(nullptr));
  EXPECT_FALSE(toArrayValue(nullptr));
  CMPIString nullHandle{nullptr, &foreignStringTable};
  EXPECT_FALSE(toText(&nullHandle));
  CMPIObjectPath nullPath{nullptr, &foreignPathTable};
  EXPECT_FALSE(toObjectPathValue(&nullPath));
}

TEST_F(ConvertTest, ObjectPathRoundTrip) {
  ObjectPathValue value("root/cimv2", "KESTA_BlueLight");
  value.setHost("h").addKey("DeviceID", "x").addKey("Index", Value::uint16(3));
  CMPIObjectPath* path = makeObjectPath(broker, value);
  ASSERT_NE(path, nullptr);
  EXPECT_EQ(toObjectPathValue(path), value);
}

TEST_F(ConvertTest, InstanceRoundTripUsesTheComputedPath) {
  InstanceValue value(ObjectPathValue("root/cimv2", "KESTA_BlueLight"));
  value.set("DeviceID", "x")
      .set("CreationClassName", "KESTA_BlueLight")
      .set("Other", Value::uint8(1));
  CMPIInstance* instance = makeInstance(broker, value);
  const std::optional<InstanceValue> back = toInstanceValue(instance);
  ASSERT_TRUE(back);
  EXPECT_EQ(back->properties(), value.properties());
  // Keys come from the key table in its order, not from the order the properties were set.
  EXPECT_EQ(back->path().toString(),
            "root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\",DeviceID=\"x\"");
}

TEST_F(ConvertTest, ArrayRoundTrip) {
  const Value value = Value::array(CMPI_string, {"a", Value::null(CMPI_string), "c"});
  CMPIArray* array = makeArray(broker, value);
  ASSERT_NE(array, nullptr);
  EXPECT_EQ(toArrayValue(array), value);
  EXPECT_EQ(makeArray(broker, Value::uint8(1)), nullptr);
  EXPECT_EQ(makeArray(broker, Value::null(CMPI_uint8A)), nullptr);
}

TEST_F(ConvertTest, DataRoundTripForEveryKind) {
  ObjectPathValue path("ns", "C");
  path.addKey("K", "v");
  InstanceValue instance(path);
  instance.set("P", Value::sint32(-1));
  const std::vector<Value> values = {
      Value::boolean(true),
      Value::char16(66),
      Value::uint8(200),
      Value::uint16(60000),
      Value::uint32(4000000000u),
      Value::uint64(1ULL << 60),
      Value::sint8(-100),
      Value::sint16(-30000),
      Value::sint32(-2000000000),
      Value::sint64(-(1LL << 60)),
      Value::real32(0.25f),
      Value::real64(1e300),
      Value::string("text"),
      Value::dateTime("20240229235959.123456+000"),
      Value::dateTime("00000001020304.000005:000"),
      Value::reference(path),
      Value::null(CMPI_uint32),
      Value::array(CMPI_ref, {Value::reference(path)}),
      Value::array(CMPI_real64, {}),
  };
  for (const Value& value : values) {
    EXPECT_EQ(toValue(makeData(broker, value)), value) << value;
  }
  // Instances come back with their computed path; this class has no key table entry, so the
  // creation path stays.
  EXPECT_EQ(toValue(makeData(broker, Value::instance(instance))), Value::instance(instance));
}

TEST_F(ConvertTest, SetterConventionForChars) {
  const char* text = "plain";
  EXPECT_EQ(toValue(reinterpret_cast<const CMPIValue*>(text), CMPI_chars), Value::string("plain"));
  CMPIValue number{};
  number.uint16 = 9;
  EXPECT_EQ(toValue(&number, CMPI_uint16), Value::uint16(9));
  EXPECT_EQ(toValue(nullptr, CMPI_uint16), Value::null(CMPI_uint16));
  CMPIValue nullRef{};
  nullRef.ref = nullptr;
  EXPECT_EQ(toValue(&nullRef, CMPI_ref), Value::null(CMPI_ref));
}

TEST_F(ConvertTest, DataStatesMakeNullValues) {
  CMPIData data{};
  data.type = CMPI_uint16;
  data.state = CMPI_nullValue;
  EXPECT_EQ(toValue(data), Value::null(CMPI_uint16));
  data.state = CMPI_notFound;
  EXPECT_EQ(toValue(data), Value::null(CMPI_uint16));
  data.state = CMPI_keyValue;
  data.value.uint16 = 4;
  EXPECT_EQ(toValue(data), Value::uint16(4));
  data.type = CMPI_chars;
  data.value.chars = nullptr;
  EXPECT_EQ(toValue(data), Value::null(CMPI_string));
  data.type = CMPI_string;
  data.value.string = nullptr;
  EXPECT_EQ(toValue(data), Value::null(CMPI_string));
}

TEST_F(ConvertTest, ForeignObjectsAreReadThroughTheirTables) {
  CMPIString foreign{const_cast<char*>("far away"), &foreignStringTable};
  EXPECT_EQ(toText(&foreign), "far away");
  ForeignPath path = makeForeignPath();
  const std::optional<ObjectPathValue> value = toObjectPathValue(&path.cmpi);
  ASSERT_TRUE(value);
  EXPECT_EQ(value->toString(), "//far/root/other:Foreign_Class.Id=42");
  EXPECT_EQ(*value->findKey("Id"), Value::uint16(42));
}

TEST_F(ConvertTest, ForeignObjectsCanBeStoredInHostObjects) {
  ForeignPath path = makeForeignPath();
  CMPIInstance* instance = newInstance("root/cimv2", "Assoc");
  const CMPIObjectPath* reference = &path.cmpi;
  CMPIStatus rc = instance->ft->setProperty(
      instance, "Ref", reinterpret_cast<const CMPIValue*>(&reference), CMPI_ref);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(toInstanceValue(instance)->find("Ref")->asReference().className(), "Foreign_Class");
}

TEST_F(ConvertTest, StatusValues) {
  EXPECT_EQ(toStatusValue(CMPIStatus{CMPI_RC_OK, nullptr}), StatusValue(CMPI_RC_OK));
  CMPIString* message = makeString(broker, "why");
  EXPECT_EQ(toStatusValue(CMPIStatus{CMPI_RC_ERR_FAILED, message}),
            StatusValue(CMPI_RC_ERR_FAILED, "why"));
  CMPIString nullHandle{nullptr, &foreignStringTable};
  EXPECT_EQ(toStatusValue(CMPIStatus{CMPI_RC_ERR_FAILED, &nullHandle}),
            StatusValue(CMPI_RC_ERR_FAILED));
}

TEST_F(ConvertTest, MadeObjectsBelongToTheCurrentRequest) {
  const std::size_t before = request->liveObjectCount();
  makeString(broker, "a");
  makeObjectPath(broker, ObjectPathValue("ns", "C"));
  EXPECT_EQ(request->liveObjectCount(), before + 2);
  EXPECT_EQ(broker.brokerOwnedObjectCount(), 0u);
}

TEST(ConvertWithoutRequestTest, MadeObjectsBelongToTheBroker) {
  Broker broker;
  makeString(broker, "a");
  EXPECT_EQ(broker.brokerOwnedObjectCount(), 1u);
  EXPECT_EQ(broker.liveObjectCount(), 1u);
}

}  // namespace
}  // namespace cmpihost
