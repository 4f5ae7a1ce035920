// CMPIArgs: named arguments, clones and failures.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;
using testing::isNull;

using ArgsObjectTest = HostTest;

TEST_F(ArgsObjectTest, AddAndReadArguments) {
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIArgs* args = CMNewArgs(mb(), &rc);
  ASSERT_NE(args, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  CMPIUint16 state = 3;
  EXPECT_EQ(CMAddArg(args, "RequestedState", &state, CMPI_uint16).rc, CMPI_RC_OK);
  EXPECT_EQ(CMAddArg(args, "Reason", "test", CMPI_chars).rc, CMPI_RC_OK);
  EXPECT_EQ(CMGetArgCount(args, &rc), 2u);
  EXPECT_EQ(CMGetArg(args, "requestedstate", &rc).value.uint16, 3);
  CMPIString* name = nullptr;
  const CMPIData reason = CMGetArgAt(args, 1, &name, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(text(name), "Reason");
  EXPECT_EQ(text(reason.value.string), "test");
}

TEST_F(ArgsObjectTest, MissingArgumentsAndNullArguments) {
  CMPIArgs* args = CMNewArgs(mb(), nullptr);
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_TRUE(isNull(CMGetArg(args, "Nothing", &rc)));
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_FOUND);
  CMGetArg(args, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  CMGetArgAt(args, 0, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_EQ(CMAddArg(args, nullptr, "x", CMPI_chars).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMAddArg(args, "X", nullptr, CMPI_chars).rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(ArgsObjectTest, CloneAndRelease) {
  CMPIArgs* args = CMNewArgs(mb(), nullptr);
  CMAddArg(args, "A", "1", CMPI_chars);
  CMPIArgs* copy = CMClone(args, nullptr);
  ASSERT_NE(copy, nullptr);
  CMAddArg(args, "B", "2", CMPI_chars);
  EXPECT_EQ(CMGetArgCount(copy, nullptr), 1u);
  EXPECT_EQ(CMRelease(copy).rc, CMPI_RC_OK);
  EXPECT_EQ(CMRelease(args).rc, CMPI_RC_OK);
}

TEST_F(ArgsObjectTest, NullHandleFailsCleanly) {
  CMPIArgs* args = CMNewArgs(mb(), nullptr);
  args->hdl = nullptr;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMGetArgCount(args, &rc), 0u);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  CMGetArg(args, "x", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  CMGetArgAt(args, 0, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMAddArg(args, "x", "y", CMPI_chars).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMClone(args, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMRelease(args).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

}  // namespace
}  // namespace cmpihost
