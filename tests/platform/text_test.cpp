// The text helpers: printable log text, UTF-8 both ways and the lossless path form.
#include <gtest/gtest.h>

#include <string>

#include "text/Text.h"

namespace {

using namespace Kesta::platform;

TEST(Text, CaseFoldingIsAsciiOnly) {
  EXPECT_TRUE(equalsIgnoringCase("KESTA_BlueLight", "kesta_bluelight"));
  EXPECT_FALSE(equalsIgnoringCase("abc", "abcd"));
  EXPECT_FALSE(equalsIgnoringCase("\xC3\x84", "\xC3\xA4"));
  EXPECT_EQ(asciiLowerCopy("DeviceID"), "deviceid");
}

TEST(Text, RecognisesWellFormedUtf8) {
  EXPECT_TRUE(isValidUtf8(""));
  EXPECT_TRUE(isValidUtf8("Blaue Leuchte \xC3\xA4\xE2\x82\xAC\xF0\x9F\x92\xA1"));
  EXPECT_FALSE(isValidUtf8("\xFF"));
  EXPECT_FALSE(isValidUtf8("\xC0\xAF"));          // overlong "/"
  EXPECT_FALSE(isValidUtf8("\xED\xA0\x80"));      // a surrogate
  EXPECT_FALSE(isValidUtf8("\xF4\x90\x80\x80"));  // past U+10FFFF
  EXPECT_FALSE(isValidUtf8("\xE2\x82"));          // cut short
}

TEST(Text, PrintableEscapesControlsAndBrokenBytes) {
  EXPECT_EQ(printable("plain text"), "plain text");
  EXPECT_EQ(printable("a\nb\tc"), "a\\x0Ab\\x09c");
  EXPECT_EQ(printable("\xFF/x"), "\\xFF/x");
  EXPECT_EQ(printable("Voyant bleu \xC3\xA9"), "Voyant bleu \xC3\xA9");
  EXPECT_EQ(printable(std::string("a\0b", 3)), "a\\x00b");
}

TEST(Text, WideToUtf8ReplacesWhatIsNotUnicode) {
  EXPECT_EQ(utf8FromWide(L"Blue Light"), "Blue Light");
  EXPECT_EQ(utf8FromWide(L"\u00E4\u20AC\U0001F4A1"), "\xC3\xA4\xE2\x82\xAC\xF0\x9F\x92\xA1");
  std::wstring broken;
  broken.push_back(static_cast<wchar_t>(0xD800));
  broken.push_back(static_cast<wchar_t>(0x110000));
  EXPECT_EQ(utf8FromWide(broken), "\xEF\xBF\xBD\xEF\xBF\xBD");
}

TEST(Text, Utf8ToWideReplacesBrokenBytes) {
  EXPECT_EQ(wideFromUtf8("Voyant bleu"), L"Voyant bleu");
  EXPECT_EQ(wideFromUtf8("\xC3\xA4"), L"\u00E4");
  EXPECT_EQ(wideFromUtf8("a\xFF"
                         "b"),
            L"a\uFFFDb");
}

TEST(Text, PathsSurviveTheWideFormUnchanged) {
  const std::string path = "/opt/x\xFF\xC3\xA4/\xE2\x82/share/locale";
  EXPECT_EQ(pathFromWide(wideFromPath(path)), path);
  EXPECT_EQ(wideFromPath("/usr/share/locale"), L"/usr/share/locale");
}

}  // namespace
