// The text library, one table per function: case folding, UTF-8 checks and encoding, the three
// quoting styles, printable log text, and the wide forms of text and paths. Every row states the
// exact text expected, because these texts end up in recordings, tool output and log lines.
#include <gtest/gtest.h>

#include <cstdio>
#include <initializer_list>
#include <optional>
#include <string>

#include "text/Text.h"

namespace {

using namespace Kesta::platform;

// A text with a NUL byte inside, which a string literal alone would cut short.
std::string withNul(const char* before, const char* after) {
  return std::string(before) + '\0' + after;
}

// ---- case folding ----------------------------------------------------------------------------

TEST(Text, AsciiLowerFoldsOnlyAToZ) {
  const struct {
    char input;
    char expected;
  } cases[] = {{'A', 'a'}, {'Z', 'z'}, {'M', 'm'}, {'a', 'a'}, {'z', 'z'},
               {'@', '@'}, {'[', '['}, {'_', '_'}, {'0', '0'}, {'\xC4', '\xC4'}};
  for (const auto& c : cases) {
    EXPECT_EQ(asciiLower(c.input), c.expected) << "input " << static_cast<int>(c.input);
  }
}

TEST(Text, EqualsIgnoringCaseFoldsOnlyAscii) {
  const struct {
    const char* first;
    const char* second;
    bool expected;
  } cases[] = {
      {"KESTA_BlueLight", "kesta_bluelight", true},
      {"DeviceID", "deviceid", true},
      {"DeviceID", "DeviceI", false},
      {"abc", "abcd", false},
      {"", "", true},
      {"", "a", false},
      {"root/CIMV2", "root/cimv2", true},
      {"a_b", "A_B", true},
      {"@", "`", false},                // the bytes just before A and just before a
      {"[", "{", false},                // and just after Z and z
      {"\xC3\x84", "\xC3\xA4", false},  // A with diaeresis: not ASCII, not folded
      {"I", "i", true},                 // whatever the process's locale
  };
  for (const auto& c : cases) {
    EXPECT_EQ(equalsIgnoringCase(c.first, c.second), c.expected) << c.first << " / " << c.second;
    EXPECT_EQ(equalsIgnoringCase(c.second, c.first), c.expected) << c.second << " / " << c.first;
  }
}

TEST(Text, AsciiLowerCopyFoldsOnlyAscii) {
  const struct {
    std::string input;
    std::string expected;
  } cases[] = {
      {"DeviceID", "deviceid"},
      {"", ""},
      {"KESTA_BlueLight", "kesta_bluelight"},
      {"already lower", "already lower"},
      {"\xC3\x84X", "\xC3\x84x"},
      {withNul("A", "B"), withNul("a", "b")},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(asciiLowerCopy(c.input), c.expected) << c.input;
  }
}

// ---- UTF-8 -----------------------------------------------------------------------------------

TEST(Text, RecognisesWellFormedUtf8) {
  const struct {
    std::string input;
    bool expected;
  } cases[] = {
      {"", true},
      {"Blaue Leuchte \xC3\xA4\xE2\x82\xAC\xF0\x9F\x92\xA1", true},
      {withNul("a", "b"), true},
      {"\xFF", false},
      {"\xC0\xAF", false},          // overlong "/"
      {"\xED\xA0\x80", false},      // a surrogate
      {"\xF4\x90\x80\x80", false},  // past U+10FFFF
      {"\xE2\x82", false},          // cut short
      {"\x80", false},              // a continuation byte alone
  };
  for (const auto& c : cases) {
    EXPECT_EQ(isValidUtf8(c.input), c.expected) << c.input;
  }
}

TEST(Text, Utf8SequenceLengthOfTheFirstSequence) {
  const struct {
    std::string input;
    std::size_t expected;
  } cases[] = {
      {"", 0},
      {"a", 1},
      {"ab", 1},
      {"\xC3\xA4x", 2},
      {"\xE2\x82\xAC", 3},
      {"\xF0\x9F\x92\xA1", 4},
      {"\xE2\x82", 0},      // cut short
      {"\xC0\xAF", 0},      // overlong
      {"\xED\xA0\x80", 0},  // a surrogate
      {"\xFF", 0},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(utf8SequenceLength(c.input), c.expected) << c.input;
  }
}

// The two encoders side by side: they agree on every Unicode scalar value of 16 bits and differ
// only on surrogates, which appendUtf8 replaces with U+FFFD and appendUtf8KeepingSurrogates
// writes as they are. Past 16 bits only appendUtf8 applies (no `keepingSurrogates`).
TEST(Text, AppendUtf8AndAppendUtf8KeepingSurrogates) {
  const struct {
    char32_t codePoint;
    std::string utf8;
    std::optional<std::string> keepingSurrogates;
  } cases[] = {
      {U'A', "A", "A"},
      {0x00, std::string(1, '\0'), std::string(1, '\0')},
      {0x7F, "\x7F", "\x7F"},
      {0x80, "\xC2\x80", "\xC2\x80"},
      {0xE4, "\xC3\xA4", "\xC3\xA4"},
      {0x7FF, "\xDF\xBF", "\xDF\xBF"},
      {0x800, "\xE0\xA0\x80", "\xE0\xA0\x80"},
      {0x20AC, "\xE2\x82\xAC", "\xE2\x82\xAC"},
      {0xD7FF, "\xED\x9F\xBF", "\xED\x9F\xBF"},
      {0xD800, "\xEF\xBF\xBD", "\xED\xA0\x80"},  // surrogates: replaced, or kept
      {0xDBFF, "\xEF\xBF\xBD", "\xED\xAF\xBF"},
      {0xDC00, "\xEF\xBF\xBD", "\xED\xB0\x80"},
      {0xDFFF, "\xEF\xBF\xBD", "\xED\xBF\xBF"},
      {0xE000, "\xEE\x80\x80", "\xEE\x80\x80"},
      {0xFFFD, "\xEF\xBF\xBD", "\xEF\xBF\xBD"},
      {0xFFFF, "\xEF\xBF\xBF", "\xEF\xBF\xBF"},
      {0x10000, "\xF0\x90\x80\x80", std::nullopt},
      {0x1F4A1, "\xF0\x9F\x92\xA1", std::nullopt},
      {0x10FFFF, "\xF4\x8F\xBF\xBF", std::nullopt},
      {0x110000, "\xEF\xBF\xBD", std::nullopt},  // past U+10FFFF: replaced
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(static_cast<unsigned>(c.codePoint));
    std::string out = "x";
    appendUtf8(out, c.codePoint);
    EXPECT_EQ(out, "x" + c.utf8);
    if (!c.keepingSurrogates) continue;
    std::string kept = "x";
    appendUtf8KeepingSurrogates(kept, static_cast<char16_t>(c.codePoint));
    EXPECT_EQ(kept, "x" + *c.keepingSurrogates);
  }
}

// ---- quoting ---------------------------------------------------------------------------------

struct QuoteCase {
  std::string input;
  std::string hexBytes;
  std::string mof;
  std::string json;
};

TEST(Text, QuotedInEachStyle) {
  const QuoteCase cases[] = {
      {"", R"("")", R"("")", R"("")"},
      {"Blue Light:1.2", R"("Blue Light:1.2")", R"("Blue Light:1.2")", R"("Blue Light:1.2")"},
      {R"(say "hi")", R"("say \"hi\"")", R"("say \"hi\"")", R"("say \"hi\"")"},
      {R"(back\slash)", R"("back\\slash")", R"("back\\slash")", R"("back\\slash")"},
      {"line1\nline2", R"("line1\nline2")", R"("line1\nline2")", R"("line1\nline2")"},
      {"a\tb\rc", R"("a\tb\rc")", R"("a\tb\rc")", R"("a\tb\rc")"},
      // Where the styles differ: backspace and form feed, the other controls, DEL.
      {"\b", R"("\x08")", R"("\b")", R"("\u0008")"},
      {"\f", R"("\x0C")", R"("\f")", R"("\u000c")"},
      {withNul("nul", "x"), R"("nul\x00x")", R"("nul\x0000x")", R"("nul\u0000x")"},
      {"\x01", R"("\x01")", R"("\x0001")", R"("\u0001")"},
      {"\x1B[1m", R"("\x1B[1m")", R"("\x001B[1m")", R"("\u001b[1m")"},
      {"\x1F", R"("\x1F")", R"("\x001F")", R"("\u001f")"},
      {"\x7F", "\"\x7F\"", R"("\x007F")", "\"\x7F\""},
      // Everything else is kept byte for byte, well-formed or not.
      {" ~", R"(" ~")", R"(" ~")", R"(" ~")"},
      {"Voyant bleu \xC3\xA9", "\"Voyant bleu \xC3\xA9\"", "\"Voyant bleu \xC3\xA9\"",
       "\"Voyant bleu \xC3\xA9\""},
      {"\xFF\x80", "\"\xFF\x80\"", "\"\xFF\x80\"", "\"\xFF\x80\""},
      {"'single'", R"("'single'")", R"("'single'")", R"("'single'")"},
  };
  for (const QuoteCase& c : cases) {
    SCOPED_TRACE(c.input);
    EXPECT_EQ(quoted(c.input, QuoteStyle::kHexBytes), c.hexBytes);
    EXPECT_EQ(quoted(c.input, QuoteStyle::kMof), c.mof);
    EXPECT_EQ(quoted(c.input, QuoteStyle::kJson), c.json);
  }
}

TEST(Text, QuotedWritesEveryControlOfEachStyle) {
  // Every byte below U+0020: the three short escapes, then the style's own forms.
  for (unsigned byte = 0; byte < 0x20; ++byte) {
    const std::string input(1, static_cast<char>(byte));
    SCOPED_TRACE(byte);
    const char* shortEscape = byte == '\n'   ? "\\n"
                              : byte == '\t' ? "\\t"
                              : byte == '\r' ? "\\r"
                                             : nullptr;
    char hexBytes[8];
    char mof[8];
    char json[8];
    std::snprintf(hexBytes, sizeof hexBytes, "\\x%02X", byte);
    std::snprintf(mof, sizeof mof, "\\x%04X", byte);
    std::snprintf(json, sizeof json, "\\u%04x", byte);
    const std::string mofForm = byte == '\b' ? "\\b" : byte == '\f' ? "\\f" : mof;
    EXPECT_EQ(quoted(input, QuoteStyle::kHexBytes),
              "\"" + std::string(shortEscape ? shortEscape : hexBytes) + "\"");
    EXPECT_EQ(quoted(input, QuoteStyle::kMof),
              "\"" + (shortEscape ? std::string(shortEscape) : mofForm) + "\"");
    EXPECT_EQ(quoted(input, QuoteStyle::kJson),
              "\"" + std::string(shortEscape ? shortEscape : json) + "\"");
  }
}

// ---- printable log text ----------------------------------------------------------------------

TEST(Text, PrintableEscapesControlsAndBrokenBytes) {
  const struct {
    std::string input;
    std::string expected;
  } cases[] = {
      {"", ""},
      {"plain text", "plain text"},
      {"a\nb\tc", "a\\x0Ab\\x09c"},
      {"\xFF/x", "\\xFF/x"},
      {"Voyant bleu \xC3\xA9", "Voyant bleu \xC3\xA9"},
      {withNul("a", "b"), "a\\x00b"},
      {"\x7F", "\\x7F"},
      {"\xE2\x82", "\\xE2\\x82"},           // cut short: each byte on its own
      {"\xED\xA0\x80", "\\xED\\xA0\\x80"},  // a surrogate is not UTF-8
      {"quote \" and \\ stay", "quote \" and \\ stay"},
      {"\xF0\x9F\x92\xA1", "\xF0\x9F\x92\xA1"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(printable(c.input), c.expected) << c.input;
  }
}

// ---- wide forms ------------------------------------------------------------------------------

// A wide string of the given code points, some of which no wide literal could hold.
std::wstring wide(std::initializer_list<unsigned> codePoints) {
  std::wstring text;
  for (const unsigned codePoint : codePoints) text.push_back(static_cast<wchar_t>(codePoint));
  return text;
}

TEST(Text, WideToUtf8ReplacesWhatIsNotUnicode) {
  const struct {
    std::wstring input;
    std::string expected;
  } cases[] = {
      {L"", ""},
      {L"Blue Light", "Blue Light"},
      {L"\u00E4\u20AC\U0001F4A1", "\xC3\xA4\xE2\x82\xAC\xF0\x9F\x92\xA1"},
      {wide({0xD800, 0x110000}), "\xEF\xBF\xBD\xEF\xBF\xBD"},
      {wide({'a', 0xDC80, 'b'}),
       "a\xEF\xBF\xBD"
       "b"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(utf8FromWide(c.input), c.expected) << c.expected;
  }
}

TEST(Text, Utf8ToWideReplacesBrokenBytes) {
  const struct {
    std::string input;
    std::wstring expected;
  } cases[] = {
      {"", L""},
      {"Voyant bleu", L"Voyant bleu"},
      {"\xC3\xA4", L"\u00E4"},
      {"\xF0\x9F\x92\xA1", L"\U0001F4A1"},
      {"a\xFF"
       "b",
       L"a\uFFFDb"},
      {"\xE2\x82", L"\uFFFD\uFFFD"},
      {"\xED\xA0\x80", L"\uFFFD\uFFFD\uFFFD"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(wideFromUtf8(c.input), c.expected) << c.input;
  }
}

TEST(Text, PathsSurviveTheWideFormUnchanged) {
  const struct {
    std::string path;
    std::wstring wideForm;
  } cases[] = {
      {"/usr/share/locale", L"/usr/share/locale"},
      {"", L""},
      {"/opt/\xC3\xA4", L"/opt/\u00E4"},
      {"/opt/x\xFF", wide({'/', 'o', 'p', 't', '/', 'x', 0xDCFF})},
      {"\xE2\x82/", wide({0xDCE2, 0xDC82, '/'})},
      {"/opt/x\xFF\xC3\xA4/\xE2\x82/share/locale",
       wide({'/', 'o', 'p', 't', '/', 'x', 0xDCFF, 0xE4, '/', 0xDCE2, 0xDC82, '/',
             's', 'h', 'a', 'r', 'e', '/', 'l',    'o',  'c', 'a',    'l',    'e'})},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(wideFromPath(c.path), c.wideForm) << c.path;
    EXPECT_EQ(pathFromWide(c.wideForm), c.path) << c.path;
  }
}

TEST(Text, PathFromWideWritesOtherCodePointsAsUtf8) {
  const struct {
    std::wstring input;
    std::string expected;
  } cases[] = {
      {wide({0xDC7F}), "\xEF\xBF\xBD"},  // just below the escapes: a lone surrogate
      {wide({0xDD00}), "\xEF\xBF\xBD"},  // just above them
      {wide({0xDC80}), "\x80"},
      {wide({0x1F4A1}), "\xF0\x9F\x92\xA1"},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(pathFromWide(c.input), c.expected) << c.expected;
  }
}

}  // namespace
