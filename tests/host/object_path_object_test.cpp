// CMPIObjectPath: every table function, copies, and failures.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;
using testing::isNull;
using testing::statusOf;

using ObjectPathObjectTest = HostTest;

TEST_F(ObjectPathObjectTest, NamespaceHostAndClass) {
  CMPIObjectPath* path = newPath("root/cimv2", "KESTA_BlueLight");
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  EXPECT_EQ(text(CMGetNameSpace(path, &rc)), "root/cimv2");
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(text(CMGetClassName(path, &rc)), "KESTA_BlueLight");
  EXPECT_EQ(text(CMGetHostname(path, &rc)), "");
  EXPECT_EQ(CMSetNameSpace(path, "root/other").rc, CMPI_RC_OK);
  EXPECT_EQ(CMSetHostname(path, "server").rc, CMPI_RC_OK);
  EXPECT_EQ(CMSetClassName(path, "KESTA_Other").rc, CMPI_RC_OK);
  EXPECT_EQ(toObjectPathValue(path)->toString(), "//server/root/other:KESTA_Other");
}

TEST_F(ObjectPathObjectTest, NullNamespaceMeansNone) {
  CMPIObjectPath* path = newPath(nullptr, "KESTA_BlueLight");
  ASSERT_NE(path, nullptr);
  EXPECT_EQ(text(CMGetNameSpace(path, nullptr)), "");
}

TEST_F(ObjectPathObjectTest, NullClassNameIsRefused) {
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMNewObjectPath(mb(), "ns", nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(ObjectPathObjectTest, KeysOfEveryKind) {
  CMPIObjectPath* path = newPath("root/cimv2", "KESTA_BlueLight");
  CMPIUint16 number = 12;
  CMPIBoolean flag = 1;
  CMPIObjectPath* other = newPath("root/cimv2", "KESTA_ComputerSystem");
  CMAddKey(other, "Name", "host1", CMPI_chars);
  CMPIString* string = CMNewString(mb(), "str", nullptr);
  EXPECT_EQ(CMAddKey(path, "Chars", "Blue Light:1", CMPI_chars).rc, CMPI_RC_OK);
  EXPECT_EQ(CMAddKey(path, "String", &string, CMPI_string).rc, CMPI_RC_OK);
  EXPECT_EQ(CMAddKey(path, "Number", &number, CMPI_uint16).rc, CMPI_RC_OK);
  EXPECT_EQ(CMAddKey(path, "Flag", &flag, CMPI_boolean).rc, CMPI_RC_OK);
  EXPECT_EQ(CMAddKey(path, "Ref", &other, CMPI_ref).rc, CMPI_RC_OK);

  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  EXPECT_EQ(CMGetKeyCount(path, &rc), 5u);
  const CMPIData chars = CMGetKey(path, "chars", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  ASSERT_EQ(chars.type, CMPI_string);
  EXPECT_NE(chars.state & CMPI_keyValue, 0);
  EXPECT_STREQ(CMGetCharPtr(chars.value.string), "Blue Light:1");
  EXPECT_EQ(CMGetKey(path, "Number", nullptr).value.uint16, 12);
  EXPECT_EQ(CMGetKey(path, "Flag", nullptr).value.boolean, 1);
  const CMPIData ref = CMGetKey(path, "Ref", nullptr);
  ASSERT_EQ(ref.type, CMPI_ref);
  EXPECT_EQ(text(CMGetClassName(ref.value.ref, nullptr)), "KESTA_ComputerSystem");

  CMPIString* name = nullptr;
  const CMPIData second = CMGetKeyAt(path, 1, &name, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(text(name), "String");
  EXPECT_STREQ(CMGetCharPtr(second.value.string), "str");
}

TEST_F(ObjectPathObjectTest, AddKeyCopiesReferences) {
  CMPIObjectPath* path = newPath("ns", "Assoc");
  CMPIObjectPath* other = newPath("ns", "Part");
  CMAddKey(path, "Part", &other, CMPI_ref);
  CMSetClassName(other, "Changed");
  EXPECT_EQ(CMRelease(other).rc, CMPI_RC_OK);
  EXPECT_EQ(toObjectPathValue(path)->findKey("Part")->asReference().className(), "Part");
}

TEST_F(ObjectPathObjectTest, MissingKeysAndIndexes) {
  CMPIObjectPath* path = newPath("ns", "C");
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  const CMPIData missing = CMGetKey(path, "DeviceID", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_TRUE(isNull(missing));
  EXPECT_EQ(missing.value.string, nullptr);
  CMPIString* name = reinterpret_cast<CMPIString*>(0x1);
  CMGetKeyAt(path, 0, &name, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_EQ(name, nullptr);
  EXPECT_EQ(CMGetKeyCount(path, &rc), 0u);
}

TEST_F(ObjectPathObjectTest, NullArguments) {
  CMPIObjectPath* path = newPath("ns", "C");
  EXPECT_EQ(CMSetNameSpace(path, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMSetHostname(path, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMSetClassName(path, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMAddKey(path, nullptr, "x", CMPI_chars).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMAddKey(path, "K", nullptr, CMPI_chars).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  CMPIObjectPath* nullRef = nullptr;
  EXPECT_EQ(CMAddKey(path, "K", &nullRef, CMPI_ref).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  CMGetKey(path, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMSetNameSpaceFromObjectPath(path, nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMGetKeyCount(path, nullptr), 0u);  // nothing was added by the failed calls
}

TEST_F(ObjectPathObjectTest, ObjectsWithNullHandlesInValues) {
  CMPIObjectPath* path = newPath("ns", "C");
  CMPIObjectPath* broken = newPath("ns", "Broken");
  broken->hdl = nullptr;
  EXPECT_EQ(CMAddKey(path, "K", &broken, CMPI_ref).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMSetNameSpaceFromObjectPath(path, broken).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(ObjectPathObjectTest, NamespaceAndHostFromAnotherPath) {
  CMPIObjectPath* path = newPath("ns", "C");
  CMPIObjectPath* source = newPath("root/source", "S");
  CMSetHostname(source, "source-host");
  EXPECT_EQ(CMSetNameSpaceFromObjectPath(path, source).rc, CMPI_RC_OK);
  EXPECT_EQ(toObjectPathValue(path)->toString(), "root/source:C");
  EXPECT_EQ(CMSetHostAndNameSpaceFromObjectPath(path, source).rc, CMPI_RC_OK);
  EXPECT_EQ(toObjectPathValue(path)->toString(), "//source-host/root/source:C");
}

TEST_F(ObjectPathObjectTest, QualifiersAreNotSupported) {
  CMPIObjectPath* path = newPath("ns", "C");
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_TRUE(isNull(CMGetClassQualifier(path, "Key", &rc)));
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_SUPPORTED);
  CMGetPropertyQualifier(path, "P", "Key", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_SUPPORTED);
  CMGetMethodQualifier(path, "M", "Q", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_SUPPORTED);
  CMGetParameterQualifier(path, "M", "P", "Q", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST_F(ObjectPathObjectTest, ToStringGivesTheTextForm) {
  CMPIObjectPath* path = newPath("root/cimv2", "KESTA_BlueLight");
  CMAddKey(path, "DeviceID", "Blue Light:1.2", CMPI_chars);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  EXPECT_EQ(text(CMObjectPathToString(path, &rc)),
            "root/cimv2:KESTA_BlueLight.DeviceID=\"Blue Light:1.2\"");
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
}

TEST_F(ObjectPathObjectTest, CloneAndRelease) {
  CMPIObjectPath* path = newPath("ns", "C");
  CMAddKey(path, "K", "v", CMPI_chars);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIObjectPath* copy = CMClone(path, &rc);
  ASSERT_NE(copy, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  CMAddKey(path, "K", "changed", CMPI_chars);
  EXPECT_EQ(statusOf(CMRelease(path)), StatusValue(CMPI_RC_OK));
  EXPECT_EQ(toObjectPathValue(copy)->findKey("K")->asString(), "v");
}

TEST_F(ObjectPathObjectTest, EveryFunctionFailsCleanlyOnANullHandle) {
  CMPIObjectPath* path = newPath("ns", "C");
  CMPIObjectPath* source = newPath("ns", "S");
  path->hdl = nullptr;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  auto expectInvalid = [&](const CMPIStatus& status) {
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
  };
  expectInvalid(CMSetNameSpace(path, "x"));
  EXPECT_EQ(CMGetNameSpace(path, &rc), nullptr);
  expectInvalid(rc);
  expectInvalid(CMSetHostname(path, "x"));
  EXPECT_EQ(CMGetHostname(path, &rc), nullptr);
  expectInvalid(rc);
  expectInvalid(CMSetClassName(path, "x"));
  EXPECT_EQ(CMGetClassName(path, &rc), nullptr);
  expectInvalid(rc);
  expectInvalid(CMAddKey(path, "K", "v", CMPI_chars));
  CMGetKey(path, "K", &rc);
  expectInvalid(rc);
  CMGetKeyAt(path, 0, nullptr, &rc);
  expectInvalid(rc);
  EXPECT_EQ(CMGetKeyCount(path, &rc), 0u);
  expectInvalid(rc);
  expectInvalid(CMSetNameSpaceFromObjectPath(path, source));
  expectInvalid(CMSetHostAndNameSpaceFromObjectPath(path, source));
  CMGetClassQualifier(path, "Q", &rc);
  expectInvalid(rc);
  EXPECT_EQ(CMObjectPathToString(path, &rc), nullptr);
  expectInvalid(rc);
  EXPECT_EQ(CMClone(path, &rc), nullptr);
  expectInvalid(rc);
  expectInvalid(CMRelease(path));
}

TEST_F(ObjectPathObjectTest, NullObjectPointer) {
  const CMPIObjectPathFT* ft = newPath("ns", "C")->ft;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(ft->getClassName(nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(ft->addKey(nullptr, "K", nullptr, CMPI_null).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

}  // namespace
}  // namespace cmpihost
