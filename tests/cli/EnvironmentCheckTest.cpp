// The remark on an instrumentation setting the provider cannot use.
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>

#include "EnvironmentCheck.h"

namespace bluelight::cli {
namespace {

TEST(EnvironmentCheck, NothingToSayAboutUsableOrOtherSettings) {
  const std::string file = ::testing::TempDir() + "bluelight-cli-environment-test.json";
  std::ofstream(file) << "{\"nodes\": []}";
  EXPECT_FALSE(instrumentationRemark(nullptr).has_value());
  EXPECT_FALSE(instrumentationRemark(("file:" + file).c_str()).has_value());
  EXPECT_FALSE(instrumentationRemark((" file:" + file + " ").c_str()).has_value());
  EXPECT_FALSE(instrumentationRemark("sysfs:/sys/class/leds").has_value());
  EXPECT_FALSE(instrumentationRemark("").has_value());
  std::remove(file.c_str());
}

TEST(EnvironmentCheck, UnreadableFile) {
  EXPECT_EQ(instrumentationRemark("file:/nonexistent/tree.json"),
            "KESTA_INSTRUMENTATION names file:/nonexistent/tree.json, which cannot be read: the "
            "provider finds no lights (VNLOG_SINK=stderr shows its log)");
  EXPECT_EQ(instrumentationRemark("file:/"),
            "KESTA_INSTRUMENTATION names file:/, which cannot be read: the provider finds no "
            "lights (VNLOG_SINK=stderr shows its log)");
}

TEST(EnvironmentCheck, AListIsCheckedEntryByEntry) {
  const std::string file = ::testing::TempDir() + "bluelight-cli-environment-list.json";
  std::ofstream(file) << "{\"nodes\": []}";
  EXPECT_FALSE(instrumentationRemark(("file:" + file + ";sysfs:/x;auto").c_str()).has_value());
  EXPECT_FALSE(instrumentationRemark("auto").has_value());
  EXPECT_EQ(
      instrumentationRemark(("file:" + file + "; file:/nonexistent/b.json ;file:/c").c_str()),
      "KESTA_INSTRUMENTATION lists file:/nonexistent/b.json, which cannot be read: its lights "
      "are missing (bluelight-cli discover tells what each source gave)");
  std::remove(file.c_str());
}

}  // namespace
}  // namespace bluelight::cli
