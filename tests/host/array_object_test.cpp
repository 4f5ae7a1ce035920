// CMPIArray: size, element type, element access, copying of elements, and failures.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;
using testing::isNull;

using ArrayObjectTest = HostTest;

TEST_F(ArrayObjectTest, NewArrayHasNullElementsOfItsType) {
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIArray* array = CMNewArray(mb(), 3, CMPI_uint16, &rc);
  ASSERT_NE(array, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(CMGetArrayCount(array, &rc), 3u);
  EXPECT_EQ(CMGetArrayType(array, &rc), CMPI_uint16);
  const CMPIData element = CMGetArrayElementAt(array, 2, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(element.type, CMPI_uint16);
  EXPECT_TRUE(isNull(element));
}

TEST_F(ArrayObjectTest, ArrayTypeCodeMeansTheElementType) {
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_uint16A, nullptr);
  EXPECT_EQ(CMGetArrayType(array, nullptr), CMPI_uint16);
}

TEST_F(ArrayObjectTest, ZeroElements) {
  CMPIArray* array = CMNewArray(mb(), 0, CMPI_uint16, nullptr);
  ASSERT_NE(array, nullptr);
  EXPECT_EQ(CMGetArrayCount(array, nullptr), 0u);
  EXPECT_EQ(toArrayValue(array), Value::array(CMPI_uint16, {}));
}

TEST_F(ArrayObjectTest, SetAndGetElements) {
  CMPIArray* array = CMNewArray(mb(), 2, CMPI_uint16, nullptr);
  CMPIUint16 two = 2;
  CMPIUint16 three = 3;
  EXPECT_EQ(CMSetArrayElementAt(array, 0, &two, CMPI_uint16).rc, CMPI_RC_OK);
  EXPECT_EQ(CMSetArrayElementAt(array, 1, &three, CMPI_uint16).rc, CMPI_RC_OK);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  const CMPIData element = CMGetArrayElementAt(array, 1, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(element.type, CMPI_uint16);
  EXPECT_EQ(element.state, CMPI_goodValue);
  EXPECT_EQ(element.value.uint16, 3);
  EXPECT_EQ(toArrayValue(array), Value::array(CMPI_uint16, {Value::uint16(2), Value::uint16(3)}));
}

TEST_F(ArrayObjectTest, CharsElementsAreStoredAsStrings) {
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_chars, nullptr);
  EXPECT_EQ(CMGetArrayType(array, nullptr), CMPI_string);
  EXPECT_EQ(CMSetArrayElementAt(array, 0, "text", CMPI_chars).rc, CMPI_RC_OK);
  const CMPIData element = CMGetArrayElementAt(array, 0, nullptr);
  ASSERT_EQ(element.type, CMPI_string);
  EXPECT_STREQ(CMGetCharPtr(element.value.string), "text");
}

TEST_F(ArrayObjectTest, ReferenceElementsAreDeepCopies) {
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_ref, nullptr);
  CMPIObjectPath* path = newPath("ns", "C");
  CMAddKey(path, "K", "before", CMPI_chars);
  EXPECT_EQ(CMSetArrayElementAt(array, 0, &path, CMPI_ref).rc, CMPI_RC_OK);
  CMAddKey(path, "K", "after", CMPI_chars);
  CMRelease(path);
  const CMPIData element = CMGetArrayElementAt(array, 0, nullptr);
  EXPECT_EQ(toObjectPathValue(element.value.ref)->findKey("K")->asString(), "before");
}

TEST_F(ArrayObjectTest, OutOfRangeIndex) {
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_uint8, nullptr);
  CMPIUint8 one = 1;
  EXPECT_EQ(CMSetArrayElementAt(array, 1, &one, CMPI_uint8).rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  const CMPIData element = CMGetArrayElementAt(array, 5, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
  EXPECT_TRUE(isNull(element));
  EXPECT_NE(element.state & CMPI_notFound, 0);
}

TEST_F(ArrayObjectTest, TypeMismatch) {
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_uint16, nullptr);
  CMPIUint32 value = 1;
  EXPECT_EQ(CMSetArrayElementAt(array, 0, &value, CMPI_uint32).rc, CMPI_RC_ERR_TYPE_MISMATCH);
  // Arrays do not nest.
  CMPIArray* inner = CMNewArray(mb(), 1, CMPI_uint16, nullptr);
  EXPECT_EQ(CMSetArrayElementAt(array, 0, &inner, CMPI_uint16A).rc, CMPI_RC_ERR_TYPE_MISMATCH);
}

TEST_F(ArrayObjectTest, NullValuesAndNullType) {
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_uint16, nullptr);
  EXPECT_EQ(CMSetArrayElementAt(array, 0, nullptr, CMPI_uint16).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  CMPIUint16 value = 4;
  CMSetArrayElementAt(array, 0, &value, CMPI_uint16);
  // CMPI_null clears the element whatever the value pointer is.
  EXPECT_EQ(CMSetArrayElementAt(array, 0, nullptr, CMPI_null).rc, CMPI_RC_OK);
  EXPECT_TRUE(isNull(CMGetArrayElementAt(array, 0, nullptr)));
}

TEST_F(ArrayObjectTest, UnsupportedElementTypesAndSizes) {
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMNewArray(mb(), 1, CMPI_args, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_DATA_TYPE);
  EXPECT_EQ(CMNewArray(mb(), 0xFFFFFFFFu, CMPI_uint8, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(ArrayObjectTest, CloneCopiesTheElements) {
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_sint32, nullptr);
  CMPISint32 value = -7;
  CMSetArrayElementAt(array, 0, &value, CMPI_sint32);
  CMPIArray* copy = CMClone(array, nullptr);
  ASSERT_NE(copy, nullptr);
  value = 9;
  CMSetArrayElementAt(array, 0, &value, CMPI_sint32);
  EXPECT_EQ(CMGetArrayElementAt(copy, 0, nullptr).value.sint32, -7);
  EXPECT_EQ(CMRelease(copy).rc, CMPI_RC_OK);
}

TEST_F(ArrayObjectTest, NullHandleFailsCleanly) {
  CMPIArray* array = CMNewArray(mb(), 1, CMPI_sint32, nullptr);
  array->hdl = nullptr;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMGetArrayCount(array, &rc), 0u);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMGetArrayType(array, &rc), CMPI_null);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_TRUE(isNull(CMGetArrayElementAt(array, 0, &rc)));
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  CMPISint32 value = 1;
  EXPECT_EQ(CMSetArrayElementAt(array, 0, &value, CMPI_sint32).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMClone(array, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMRelease(array).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(ArrayObjectTest, NullArrayPointerFailsCleanly) {
  const CMPIArrayFT* ft = CMNewArray(mb(), 1, CMPI_sint32, nullptr)->ft;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(ft->getSize(nullptr, &rc), 0u);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(ft->setElementAt(nullptr, 0, nullptr, CMPI_null).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

}  // namespace
}  // namespace cmpihost
