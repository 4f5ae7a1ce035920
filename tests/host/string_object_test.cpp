// CMPIString: its table functions, the handle convention, and failures.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;
using testing::statusOf;

using StringObjectTest = HostTest;

TEST_F(StringObjectTest, HandlePointsAtTheCharacters) {
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIString* string = CMNewString(mb(), "Blue Light", &rc);
  ASSERT_NE(string, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_STREQ(CMGetCharPtr(string), "Blue Light");
  EXPECT_EQ(CMGetCharsPtr(string, &rc), CMGetCharPtr(string));
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
}

TEST_F(StringObjectTest, EmptyString) {
  CMPIString* string = CMNewString(mb(), "", nullptr);
  ASSERT_NE(string, nullptr);
  EXPECT_STREQ(CMGetCharPtr(string), "");
}

TEST_F(StringObjectTest, NewStringCopiesItsArgument) {
  char buffer[] = "abc";
  CMPIString* string = CMNewString(mb(), buffer, nullptr);
  buffer[0] = 'X';
  EXPECT_STREQ(CMGetCharPtr(string), "abc");
}

TEST_F(StringObjectTest, NullTextIsAnInvalidParameter) {
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMNewString(mb(), nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  ASSERT_NE(rc.msg, nullptr);
  EXPECT_NE(text(rc.msg).find("NULL"), std::string::npos);
}

TEST_F(StringObjectTest, CloneIsAnIndependentCopy) {
  CMPIString* string = CMNewString(mb(), "one", nullptr);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIString* copy = CMClone(string, &rc);
  ASSERT_NE(copy, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_NE(copy, string);
  EXPECT_NE(CMGetCharPtr(copy), CMGetCharPtr(string));
  EXPECT_STREQ(CMGetCharPtr(copy), "one");
  EXPECT_EQ(statusOf(CMRelease(string)), StatusValue(CMPI_RC_OK));
  EXPECT_STREQ(CMGetCharPtr(copy), "one");
}

TEST_F(StringObjectTest, ReleaseFreesNow) {
  const std::size_t before = request->liveObjectCount();
  CMPIString* string = CMNewString(mb(), "gone", nullptr);
  EXPECT_EQ(request->liveObjectCount(), before + 1);
  EXPECT_EQ(CMRelease(string).rc, CMPI_RC_OK);
  EXPECT_EQ(request->liveObjectCount(), before);
}

TEST_F(StringObjectTest, NullHandleFailsCleanly) {
  CMPIString* string = CMNewString(mb(), "x", nullptr);
  string->hdl = nullptr;  // as a broker fault would leave it
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMGetCharsPtr(string, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMClone(string, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMRelease(string).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(StringObjectTest, NullObjectPointerFailsCleanly) {
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  const CMPIStringFT* ft = CMNewString(mb(), "x", nullptr)->ft;
  EXPECT_EQ(ft->getCharPtr(nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(ft->clone(nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(ft->release(nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
  // A null rc is simply not written.
  EXPECT_EQ(ft->getCharPtr(nullptr, nullptr), nullptr);
}

TEST_F(StringObjectTest, TableVersion) {
  EXPECT_EQ(CMNewString(mb(), "x", nullptr)->ft->ftVersion, 200);
}

}  // namespace
}  // namespace cmpihost
