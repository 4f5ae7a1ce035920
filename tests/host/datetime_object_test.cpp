// CMPIDateTime: the three factories, both formats, intervals and failures.
#include <chrono>

#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;

using DateTimeObjectTest = HostTest;

TEST_F(DateTimeObjectTest, FromBinary) {
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  // 2024-02-29 23:59:59.123456 UTC
  const CMPIUint64 micros = 1709251199123456ULL;
  CMPIDateTime* dateTime = CMNewDateTimeFromBinary(mb(), micros, 0, &rc);
  ASSERT_NE(dateTime, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(CMGetBinaryFormat(dateTime, &rc), micros);
  EXPECT_EQ(CMIsInterval(dateTime, &rc), 0);
  EXPECT_EQ(text(CMGetStringFormat(dateTime, &rc)), "20240229235959.123456+000");
}

TEST_F(DateTimeObjectTest, Interval) {
  const CMPIUint64 micros = ((3ULL * 24 + 4) * 3600 + 5ULL * 60 + 6) * 1000000ULL + 7;
  CMPIDateTime* dateTime = CMNewDateTimeFromBinary(mb(), micros, 1, nullptr);
  EXPECT_EQ(CMIsInterval(dateTime, nullptr), 1);
  EXPECT_EQ(text(CMGetStringFormat(dateTime, nullptr)), "00000003040506.000007:000");
}

TEST_F(DateTimeObjectTest, FromCharsAppliesTheOffset) {
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIDateTime* dateTime = CMNewDateTimeFromChars(mb(), "20240101013000.000000+060", &rc);
  ASSERT_NE(dateTime, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(text(CMGetStringFormat(dateTime, nullptr)), "20240101003000.000000+000");
  CMPIDateTime* interval = CMNewDateTimeFromChars(mb(), "00000010000000.000000:000", nullptr);
  EXPECT_EQ(CMIsInterval(interval, nullptr), 1);
  EXPECT_EQ(CMGetBinaryFormat(interval, nullptr), 10ULL * 86400 * 1000000);
}

TEST_F(DateTimeObjectTest, FromCharsRefusesBadText) {
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMNewDateTimeFromChars(mb(), "2024", &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMNewDateTimeFromChars(mb(), "20241301000000.000000+000", &rc), nullptr);
  EXPECT_EQ(CMNewDateTimeFromChars(mb(), "19690101000000.000000+000", &rc), nullptr);
  EXPECT_EQ(CMNewDateTimeFromChars(mb(), nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(DateTimeObjectTest, NowIsNow) {
  const auto now = std::chrono::duration_cast<std::chrono::microseconds>(
                       std::chrono::system_clock::now().time_since_epoch())
                       .count();
  CMPIDateTime* dateTime = CMNewDateTime(mb(), nullptr);
  const auto taken = static_cast<long long>(CMGetBinaryFormat(dateTime, nullptr));
  EXPECT_LT(std::llabs(taken - now), 10LL * 1000000);
}

TEST_F(DateTimeObjectTest, AsPropertyValue) {
  CMPIDateTime* dateTime = CMNewDateTimeFromChars(mb(), "20240101000000.000000+000", nullptr);
  CMPIInstance* instance = newInstance("ns", "C");
  EXPECT_EQ(CMSetProperty(instance, "When", &dateTime, CMPI_dateTime).rc, CMPI_RC_OK);
  EXPECT_EQ(*toInstanceValue(instance)->find("When"), Value::dateTime("20240101000000.000000+000"));
  const CMPIData when = CMGetProperty(instance, "When", nullptr);
  ASSERT_EQ(when.type, CMPI_dateTime);
  EXPECT_EQ(text(CMGetStringFormat(when.value.dateTime, nullptr)), "20240101000000.000000+000");
}

TEST_F(DateTimeObjectTest, CloneAndNullHandle) {
  CMPIDateTime* dateTime = CMNewDateTimeFromBinary(mb(), 5, 1, nullptr);
  CMPIDateTime* copy = CMClone(dateTime, nullptr);
  ASSERT_NE(copy, nullptr);
  EXPECT_EQ(CMGetBinaryFormat(copy, nullptr), 5u);
  EXPECT_EQ(CMRelease(copy).rc, CMPI_RC_OK);
  dateTime->hdl = nullptr;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(CMGetBinaryFormat(dateTime, &rc), 0u);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMGetStringFormat(dateTime, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMIsInterval(dateTime, &rc), 0);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(CMRelease(dateTime).rc, CMPI_RC_ERR_INVALID_HANDLE);
}

}  // namespace
}  // namespace cmpihost
