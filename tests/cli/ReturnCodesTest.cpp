// CMPI return codes by name and number.
#include <gtest/gtest.h>

#include "ReturnCodes.h"

namespace bluelight::cli {
namespace {

TEST(ReturnCodes, EveryKnownCodeReadsBackByNameShortNameAndNumber) {
  for (const CMPIrc code : knownReturnCodes()) {
    const std::string name = returnCodeName(code);
    EXPECT_EQ(parseReturnCode(name), code) << name;
    EXPECT_EQ(parseReturnCode(name.substr(8)), code) << name;
    EXPECT_EQ(parseReturnCode(std::to_string(static_cast<int>(code))), code) << name;
  }
  EXPECT_EQ(knownReturnCodes().size(), 24u);
}

TEST(ReturnCodes, NamesIgnoreCase) {
  EXPECT_EQ(parseReturnCode("cmpi_rc_err_failed"), CMPI_RC_ERR_FAILED);
  EXPECT_EQ(parseReturnCode("Err_Not_Supported"), CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST(ReturnCodes, AnythingElseIsRefused) {
  EXPECT_FALSE(parseReturnCode(""));
  EXPECT_FALSE(parseReturnCode("18"));
  EXPECT_FALSE(parseReturnCode("-1"));
  EXPECT_FALSE(parseReturnCode("2x"));
  EXPECT_FALSE(parseReturnCode("FAILED"));
  EXPECT_FALSE(parseReturnCode("CMPI_RC_"));
}

}  // namespace
}  // namespace bluelight::cli
