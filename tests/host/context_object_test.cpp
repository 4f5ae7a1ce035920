// CMPIContext: the request's entries, added entries, clones and failures.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;
using testing::isNull;

using ContextObjectTest = HostTest;

TEST_F(ContextObjectTest, RequestEntries) {
  const CMPIContext* context = request->context();
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  EXPECT_EQ(CMGetContextEntryCount(context, &rc), 3u);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(text(CMGetContextEntry(context, CMPIInitNameSpace, &rc).value.string), "root/cimv2");
  const CMPIData flags = CMGetContextEntry(context, CMPIInvocationFlags, &rc);
  EXPECT_EQ(flags.type, CMPI_uint32);
  EXPECT_EQ(flags.value.uint32, 0u);
  EXPECT_EQ(text(CMGetContextEntry(context, CMPIPrincipal, &rc).value.string), "cmpihost");
}

TEST(ContextOptionsTest, OptionsShapeTheEntries) {
  Broker broker;
  RequestOptions options;
  options.nameSpace = "root/other";
  options.invocationFlags = CMPI_FLAG_IncludeQualifiers;
  options.principal = std::nullopt;
  Request request(broker, options);
  const CMPIContext* context = request.context();
  EXPECT_EQ(CMGetContextEntryCount(context, nullptr), 2u);
  EXPECT_EQ(toText(CMGetContextEntry(context, CMPIInitNameSpace, nullptr).value.string),
            "root/other");
  EXPECT_EQ(CMGetContextEntry(context, CMPIInvocationFlags, nullptr).value.uint32,
            static_cast<CMPIUint32>(CMPI_FLAG_IncludeQualifiers));
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  CMGetContextEntry(context, CMPIPrincipal, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
}

TEST_F(ContextObjectTest, AddAndReadEntries) {
  const CMPIContext* context = request->context();
  CMPIUint16 value = 5;
  EXPECT_EQ(CMAddContextEntry(context, "Mine", &value, CMPI_uint16).rc, CMPI_RC_OK);
  EXPECT_EQ(CMAddContextEntry(context, "Text", "t", CMPI_chars).rc, CMPI_RC_OK);
  EXPECT_EQ(CMGetContextEntry(context, "mine", nullptr).value.uint16, 5);
  CMPIString* name = nullptr;
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  const CMPIData last = CMGetContextEntryAt(context, 4, &name, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(text(name), "Text");
  EXPECT_EQ(text(last.value.string), "t");
  request->addContextEntry("FromTest", Value::boolean(true));
  EXPECT_EQ(CMGetContextEntry(context, "FromTest", nullptr).value.boolean, 1);
}

TEST_F(ContextObjectTest, FailuresAndMissingEntries) {
  const CMPIContext* context = request->context();
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_TRUE(isNull(CMGetContextEntry(context, "Nothing", &rc)));
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
  CMGetContextEntry(context, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  CMGetContextEntryAt(context, 99, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NO_SUCH_PROPERTY);
  EXPECT_EQ(CMAddContextEntry(context, nullptr, "x", CMPI_chars).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMAddContextEntry(context, "X", nullptr, CMPI_chars).rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(ContextObjectTest, CloneIsIndependentAndReleasable) {
  CMPIContext* copy = CMClone(request->context(), nullptr);
  ASSERT_NE(copy, nullptr);
  CMPIUint8 value = 1;
  CMAddContextEntry(copy, "OnlyInCopy", &value, CMPI_uint8);
  EXPECT_EQ(CMGetContextEntryCount(copy, nullptr), 4u);
  EXPECT_EQ(CMGetContextEntryCount(request->context(), nullptr), 3u);
  const std::size_t before = request->liveObjectCount();
  EXPECT_EQ(CMRelease(copy).rc, CMPI_RC_OK);
  EXPECT_EQ(request->liveObjectCount(), before - 1);
}

TEST_F(ContextObjectTest, ReleaseKeepsTheRequestsContext) {
  CMPIContext* context = request->context();
  EXPECT_EQ(CMRelease(context).rc, CMPI_RC_OK);
  EXPECT_EQ(CMGetContextEntryCount(context, nullptr), 3u);
}

TEST_F(ContextObjectTest, NullHandleFailsCleanly) {
  CMPIContext* copy = CMClone(request->context(), nullptr);
  copy->hdl = nullptr;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMGetContextEntryCount(copy, &rc), 0u);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  CMGetContextEntry(copy, "x", &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  CMGetContextEntryAt(copy, 0, nullptr, &rc);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMAddContextEntry(copy, "x", "y", CMPI_chars).rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMClone(copy, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMRelease(copy).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

}  // namespace
}  // namespace cmpihost
