// CMPIInstance: properties, copies, the property filter, the object path from the key table,
// and failures.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;
using testing::isNull;

class InstanceObjectTest : public HostTest {
 protected:
  CMPIInstance* light() { return newInstance("root/cimv2", "KESTA_BlueLight"); }

  std::vector<std::string> propertyNames(const CMPIInstance* instance) {
    std::vector<std::string> names;
    const std::optional<InstanceValue> value = toInstanceValue(instance);
    if (!value) return names;
    for (const Property& property : value->properties()) names.push_back(property.name);
    return names;
  }
};

using Names = std::vector<std::string>;

TEST_F(InstanceObjectTest, SetAndGetProperties) {
  CMPIInstance* instance = light();
  CMPIUint32 count = 7;
  EXPECT_EQ(CMSetProperty(instance, "DeviceID", "Blue Light:1", CMPI_chars).rc, CMPI_RC_OK);
  EXPECT_EQ(CMSetProperty(instance, "Count", &count, CMPI_uint32).rc, CMPI_RC_OK);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  EXPECT_EQ(CMGetPropertyCount(instance, &rc), 2u);
  const CMPIData id = CMGetProperty(instance, "deviceid", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  ASSERT_EQ(id.type, CMPI_string);
  EXPECT_STREQ(CMGetCharPtr(id.value.string), "Blue Light:1");
  CMPIString* name = nullptr;
  const CMPIData second = CMGetPropertyAt(instance, 1, &name, &rc);
  EXPECT_EQ(text(name), "Count");
  EXPECT_EQ(second.type, CMPI_uint32);
  EXPECT_EQ(second.value.uint32, 7u);
  // getPropertyAt without a name pointer is fine.
  EXPECT_EQ(CMGetPropertyAt(instance, 0, nullptr, &rc).type, CMPI_string);
}

TEST_F(InstanceObjectTest, SettingAgainReplacesInPlace) {
  CMPIInstance* instance = light();
  CMSetProperty(instance, "A", "1", CMPI_chars);
  CMSetProperty(instance, "B", "2", CMPI_chars);
  CMSetProperty(instance, "a", "3", CMPI_chars);
  EXPECT_EQ(propertyNames(instance), (Names{"A", "B"}));
  EXPECT_EQ(toInstanceValue(instance)->find("A")->asString(), "3");
}

TEST_F(InstanceObjectTest, ValuesAreCopied) {
  CMPIInstance* instance = light();
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_uint16, nullptr);
  CMPIUint16 two = 2;
  CMSetArrayElementAt(array, 0, &two, CMPI_uint16);
  CMPIObjectPath* path = newPath("ns", "Other");
  CMPIInstance* embedded = newInstance("ns", "Embedded");
  CMSetProperty(embedded, "X", "x", CMPI_chars);
  CMSetProperty(instance, "Array", &array, CMPI_uint16A);
  CMSetProperty(instance, "Ref", &path, CMPI_ref);
  CMSetProperty(instance, "Embedded", &embedded, CMPI_instance);
  CMPIUint16 nine = 9;
  CMSetArrayElementAt(array, 0, &nine, CMPI_uint16);
  CMSetClassName(path, "Changed");
  CMSetProperty(embedded, "X", "changed", CMPI_chars);
  CMRelease(array);
  CMRelease(path);
  CMRelease(embedded);
  const InstanceValue value = *toInstanceValue(instance);
  EXPECT_EQ(*value.find("Array"), Value::array(CMPI_uint16, {Value::uint16(2)}));
  EXPECT_EQ(value.find("Ref")->asReference().className(), "Other");
  EXPECT_EQ(value.find("Embedded")->asInstance().find("X")->asString(), "x");
}

TEST_F(InstanceObjectTest, ArrayPropertyWithWrongElementType) {
  CMPIInstance* instance = light();
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_uint16, nullptr);
  EXPECT_EQ(CMSetProperty(instance, "A", &array, CMPI_uint32A).rc, CMPI_RC_ERR_TYPE_MISMATCH);
  EXPECT_EQ(CMSetProperty(instance, "A", &array, CMPI_uint16A).rc, CMPI_RC_OK);
}

TEST_F(InstanceObjectTest, MissingPropertiesAndIndexes) {
  CMPIInstance* instance = light();
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  const CMPIData missing = CMGetProperty(instance, "Nothing", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
  EXPECT_TRUE(isNull(missing));
  EXPECT_NE(missing.state & CMPI_notFound, 0);
  CMGetPropertyAt(instance, 0, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
}

TEST_F(InstanceObjectTest, NullArgumentsChangeNothing) {
  CMPIInstance* instance = light();
  EXPECT_EQ(CMSetProperty(instance, nullptr, "x", CMPI_chars).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMSetProperty(instance, "P", nullptr, CMPI_uint16).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMSetProperty(instance, "P", nullptr, CMPI_chars).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  CMPIInstance* nullInstance = nullptr;
  EXPECT_EQ(CMSetProperty(instance, "P", &nullInstance, CMPI_instance).rc,
            CMPI_RC_ERR_INVALID_PARAMETER);
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  CMGetProperty(instance, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMSetObjectPath(instance, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMGetPropertyCount(instance, nullptr), 0u);
}

TEST_F(InstanceObjectTest, UnsupportedValueType) {
  CMPIInstance* instance = light();
  CMPIValue value{};
  EXPECT_EQ(CMSetProperty(instance, "P", &value, CMPI_ptr).rc, CMPI_RC_ERR_INVALID_DATA_TYPE);
}

TEST_F(InstanceObjectTest, NullTypeSetsANullProperty) {
  CMPIInstance* instance = light();
  EXPECT_EQ(CMSetProperty(instance, "P", nullptr, CMPI_null).rc, CMPI_RC_OK);
  EXPECT_TRUE(isNull(CMGetProperty(instance, "P", nullptr)));
}

// ---- Property filter ----

TEST_F(InstanceObjectTest, NullFilterListAcceptsEverything) {
  CMPIInstance* instance = light();
  const char* keys[] = {"DeviceID", nullptr};
  EXPECT_EQ(CMSetPropertyFilter(instance, nullptr, keys).rc, CMPI_RC_OK);
  CMSetProperty(instance, "DeviceID", "x", CMPI_chars);
  CMSetProperty(instance, "ElementName", "y", CMPI_chars);
  EXPECT_EQ(propertyNames(instance), (Names{"DeviceID", "ElementName"}));
}

TEST_F(InstanceObjectTest, EmptyFilterListAcceptsOnlyKeys) {
  CMPIInstance* instance = light();
  const char* none[] = {nullptr};
  const char* keys[] = {"DeviceID", nullptr};
  CMSetPropertyFilter(instance, none, keys);
  EXPECT_EQ(CMSetProperty(instance, "DeviceID", "x", CMPI_chars).rc, CMPI_RC_OK);
  // Dropped, but reported as success: the provider need not know what the client asked for.
  EXPECT_EQ(CMSetProperty(instance, "ElementName", "y", CMPI_chars).rc, CMPI_RC_OK);
  EXPECT_EQ(propertyNames(instance), (Names{"DeviceID"}));
}

TEST_F(InstanceObjectTest, FilterListPlusKeys) {
  CMPIInstance* instance = light();
  const char* list[] = {"ElementName", nullptr};
  const char* keys[] = {"DeviceID", "CreationClassName", nullptr};
  CMSetPropertyFilter(instance, list, keys);
  CMSetProperty(instance, "CreationClassName", "KESTA_BlueLight", CMPI_chars);
  CMSetProperty(instance, "DeviceID", "x", CMPI_chars);
  CMSetProperty(instance, "ElementName", "y", CMPI_chars);
  CMSetProperty(instance, "Caption", "z", CMPI_chars);
  EXPECT_EQ(propertyNames(instance), (Names{"CreationClassName", "DeviceID", "ElementName"}));
}

TEST_F(InstanceObjectTest, FilterWithNullKeys) {
  CMPIInstance* instance = light();
  const char* list[] = {"ElementName", nullptr};
  CMSetPropertyFilter(instance, list, nullptr);
  CMSetProperty(instance, "DeviceID", "x", CMPI_chars);
  CMSetProperty(instance, "ElementName", "y", CMPI_chars);
  EXPECT_EQ(propertyNames(instance), (Names{"ElementName"}));
}

TEST_F(InstanceObjectTest, FilterNamesIgnoreCase) {
  CMPIInstance* instance = light();
  const char* list[] = {"elementname", nullptr};
  const char* keys[] = {"DEVICEID", nullptr};
  CMSetPropertyFilter(instance, list, keys);
  CMSetProperty(instance, "DeviceID", "x", CMPI_chars);
  CMSetProperty(instance, "ElementName", "y", CMPI_chars);
  EXPECT_EQ(propertyNames(instance), (Names{"DeviceID", "ElementName"}));
}

TEST_F(InstanceObjectTest, FilterKeysThatAreNotThePropertiesSet) {
  // A provider may name keys that differ from what it sets; those properties are then dropped
  // when the list does not name them either.
  CMPIInstance* instance = newInstance("root/cimv2", "KESTA_BlueLightElementCapabilities");
  const char* list[] = {"Other", nullptr};
  const char* keys[] = {"Antecedent", "Dependent", nullptr};
  CMSetPropertyFilter(instance, list, keys);
  CMPIObjectPath* path = newPath("root/cimv2", "KESTA_BlueLight");
  CMSetProperty(instance, "ManagedElement", &path, CMPI_ref);
  EXPECT_EQ(CMGetPropertyCount(instance, nullptr), 0u);
  CMSetPropertyFilter(instance, nullptr, keys);
  CMSetProperty(instance, "ManagedElement", &path, CMPI_ref);
  EXPECT_EQ(CMGetPropertyCount(instance, nullptr), 1u);
}

TEST_F(InstanceObjectTest, FilterAppliesToSetPropertyWithOrigin) {
  CMPIInstance* instance = light();
  const char* none[] = {nullptr};
  CMSetPropertyFilter(instance, none, nullptr);
  EXPECT_EQ(CMSetPropertyWithOrigin(instance, "P", "x", CMPI_chars, "Origin").rc, CMPI_RC_OK);
  EXPECT_EQ(CMGetPropertyCount(instance, nullptr), 0u);
  CMSetPropertyFilter(instance, nullptr, nullptr);
  EXPECT_EQ(CMSetPropertyWithOrigin(instance, "P", "x", CMPI_chars, nullptr).rc, CMPI_RC_OK);
  EXPECT_EQ(CMGetPropertyCount(instance, nullptr), 1u);
}

// ---- Object path ----

TEST_F(InstanceObjectTest, ObjectPathTakesKeysFromTheKeyTable) {
  CMPIInstance* instance = light();
  CMSetProperty(instance, "SystemName", "host1", CMPI_chars);
  CMSetProperty(instance, "DeviceID", "Blue Light:1", CMPI_chars);
  CMSetProperty(instance, "ElementName", "not a key", CMPI_chars);
  CMSetProperty(instance, "CreationClassName", "KESTA_BlueLight", CMPI_chars);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIObjectPath* path = CMGetObjectPath(instance, &rc);
  ASSERT_NE(path, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  // In the table's order; SystemCreationClassName is not set and left out.
  EXPECT_EQ(toObjectPathValue(path)->toString(),
            "root/cimv2:KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\","
            "DeviceID=\"Blue Light:1\",SystemName=\"host1\"");
}

TEST_F(InstanceObjectTest, ObjectPathIgnoresKeysOfTheCreationPathForKnownClasses) {
  CMPIObjectPath* created = newPath("root/cimv2", "KESTA_BlueLightCapabilities");
  CMAddKey(created, "InstanceID", "from path", CMPI_chars);
  CMPIInstance* instance = CMNewInstance(mb(), created, nullptr);
  EXPECT_EQ(toObjectPathValue(CMGetObjectPath(instance, nullptr))->keys().size(), 0u);
  CMSetProperty(instance, "InstanceID", "KESTA:BlueLightCapabilities1", CMPI_chars);
  EXPECT_EQ(toObjectPathValue(CMGetObjectPath(instance, nullptr))->toString(),
            "root/cimv2:KESTA_BlueLightCapabilities.InstanceID=\"KESTA:BlueLightCapabilities1\"");
}

TEST_F(InstanceObjectTest, ObjectPathOfReferenceKeys) {
  CMPIInstance* instance = newInstance("root/cimv2", "KESTA_BlueLightSystemDevice");
  CMPIObjectPath* system = newPath("root/cimv2", "KESTA_ComputerSystem");
  CMAddKey(system, "Name", "host1", CMPI_chars);
  CMPIObjectPath* light = newPath("root/cimv2", "KESTA_BlueLight");
  CMAddKey(light, "DeviceID", "x", CMPI_chars);
  CMSetProperty(instance, "PartComponent", &light, CMPI_ref);
  CMSetProperty(instance, "GroupComponent", &system, CMPI_ref);
  const ObjectPathValue path = *toObjectPathValue(CMGetObjectPath(instance, nullptr));
  ASSERT_EQ(path.keys().size(), 2u);
  EXPECT_EQ(path.keys()[0].name, "GroupComponent");
  EXPECT_EQ(path.keys()[0].value.asReference().className(), "KESTA_ComputerSystem");
  EXPECT_EQ(path.keys()[1].value.asReference().className(), "KESTA_BlueLight");
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  const CMPIData key = CMGetKey(CMGetObjectPath(instance, nullptr), "PartComponent", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  ASSERT_EQ(key.type, CMPI_ref);
  EXPECT_EQ(text(CMGetClassName(key.value.ref, nullptr)), "KESTA_BlueLight");
}

TEST_F(InstanceObjectTest, ObjectPathOfAnUnknownClassKeepsTheCreationKeys) {
  CMPIObjectPath* created = newPath("ns", "Unknown_Class");
  CMAddKey(created, "Id", "7", CMPI_chars);
  CMPIInstance* instance = CMNewInstance(mb(), created, nullptr);
  CMSetProperty(instance, "Id", "other", CMPI_chars);
  EXPECT_EQ(toObjectPathValue(CMGetObjectPath(instance, nullptr))->toString(),
            "ns:Unknown_Class.Id=\"7\"");
}

TEST_F(InstanceObjectTest, KeyTableIsExtensible) {
  broker.setClassKeys("Unknown_Class", {"Id"});
  EXPECT_EQ(broker.classKeys("unknown_class"), (std::optional<Names>{Names{"Id"}}));
  EXPECT_EQ(broker.classKeys("KESTA_ComputerSystem"),
            (std::optional<Names>{Names{"CreationClassName", "Name"}}));
  EXPECT_FALSE(broker.classKeys("Nothing"));
  CMPIObjectPath* created = newPath("ns", "Unknown_Class");
  CMAddKey(created, "Id", "7", CMPI_chars);
  CMPIInstance* instance = CMNewInstance(mb(), created, nullptr);
  CMSetProperty(instance, "Id", "from property", CMPI_chars);
  EXPECT_EQ(toObjectPathValue(CMGetObjectPath(instance, nullptr))->toString(),
            "ns:Unknown_Class.Id=\"from property\"");
}

TEST_F(InstanceObjectTest, ObjectPathCarriesHostAndNamespace) {
  CMPIObjectPath* created = newPath("root/cimv2", "KESTA_BlueLight");
  CMSetHostname(created, "server");
  CMPIInstance* instance = CMNewInstance(mb(), created, nullptr);
  // The instance keeps its own copy of the path.
  CMSetNameSpace(created, "changed");
  EXPECT_EQ(toObjectPathValue(CMGetObjectPath(instance, nullptr))->toString(),
            "//server/root/cimv2:KESTA_BlueLight");
}

TEST_F(InstanceObjectTest, SetObjectPathReplacesThePath) {
  CMPIInstance* instance = light();
  CMPIObjectPath* path = newPath("root/other", "Unknown_Class");
  CMAddKey(path, "Id", "1", CMPI_chars);
  EXPECT_EQ(CMSetObjectPath(instance, path).rc, CMPI_RC_OK);
  EXPECT_EQ(toObjectPathValue(CMGetObjectPath(instance, nullptr))->toString(),
            "root/other:Unknown_Class.Id=\"1\"");
  path->hdl = nullptr;
  EXPECT_EQ(CMSetObjectPath(instance, path).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(InstanceObjectTest, NewInstanceRefusesUnusablePaths) {
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMNewInstance(mb(), nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  CMPIObjectPath* path = newPath("ns", "C");
  path->hdl = nullptr;
  EXPECT_EQ(CMNewInstance(mb(), path, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(InstanceObjectTest, CloneKeepsPropertiesAndFilter) {
  CMPIInstance* instance = light();
  const char* list[] = {"A", nullptr};
  CMSetPropertyFilter(instance, list, nullptr);
  CMSetProperty(instance, "A", "1", CMPI_chars);
  CMPIInstance* copy = CMClone(instance, nullptr);
  ASSERT_NE(copy, nullptr);
  CMSetProperty(copy, "B", "2", CMPI_chars);
  CMSetProperty(instance, "A", "changed", CMPI_chars);
  EXPECT_EQ(propertyNames(copy), (Names{"A"}));
  EXPECT_EQ(toInstanceValue(copy)->find("A")->asString(), "1");
  EXPECT_EQ(CMRelease(copy).rc, CMPI_RC_OK);
  EXPECT_EQ(CMRelease(instance).rc, CMPI_RC_OK);
}

TEST_F(InstanceObjectTest, EveryFunctionFailsCleanlyOnANullHandle) {
  CMPIInstance* instance = light();
  CMPIObjectPath* path = newPath("ns", "C");
  instance->hdl = nullptr;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_TRUE(isNull(CMGetProperty(instance, "P", &rc)));
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  CMGetPropertyAt(instance, 0, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMGetPropertyCount(instance, &rc), 0u);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMSetProperty(instance, "P", "x", CMPI_chars).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMGetObjectPath(instance, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMSetPropertyFilter(instance, nullptr, nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMSetObjectPath(instance, path).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMSetPropertyWithOrigin(instance, "P", "x", CMPI_chars, "o").rc,
            CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMClone(instance, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMRelease(instance).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(InstanceObjectTest, NullObjectPointer) {
  const CMPIInstanceFT* ft = light()->ft;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(ft->getObjectPath(nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(ft->setProperty(nullptr, "P", nullptr, CMPI_null).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

}  // namespace
}  // namespace cmpihost
