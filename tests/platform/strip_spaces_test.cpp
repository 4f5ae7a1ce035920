// Kesta::stripSpaces: surrounding blanks go, everything else stays.
#include <gtest/gtest.h>

#include <string>

#include "KestaCommonBase.h"

namespace {

struct StripCase {
  std::string input;
  std::string expected;
};

class StripSpaces : public ::testing::TestWithParam<StripCase> {};

TEST_P(StripSpaces, RemovesOnlySurroundingBlanks) {
  EXPECT_EQ(Kesta::stripSpaces(GetParam().input), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(Table, StripSpaces,
                         ::testing::Values(StripCase{"", ""}, StripCase{"   ", ""},
                                           StripCase{"abc", "abc"}, StripCase{"  abc  ", "abc"},
                                           StripCase{"\t\r\n\v\fabc\f\v\n\r\t", "abc"},
                                           StripCase{"Blue Light:1.2", "Blue Light:1.2"},
                                           StripCase{" a b  c ", "a b  c"}, StripCase{"x\n", "x"},
                                           StripCase{"\n\n", ""},
                                           StripCase{std::string("\0a", 2), std::string("\0a", 2)},
                                           StripCase{"\xC2\xA0x\xC2\xA0", "\xC2\xA0x\xC2\xA0"}));

}  // namespace
