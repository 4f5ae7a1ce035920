// The .mo reader: both byte orders, strict bounds, and no crash on any damaged file.
#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "PlatformTestSupport.h"
#include "locale/MoCatalogue.h"

namespace {

using Kesta::platform::MoCatalogue;

using Entries = std::vector<std::pair<std::string, std::string>>;

void putWord(std::string& out, std::uint32_t value, bool bigEndian) {
  for (int i = 0; i < 4; ++i) {
    const int shift = bigEndian ? (3 - i) * 8 : i * 8;
    out.push_back(static_cast<char>((value >> shift) & 0xFF));
  }
}

void setWord(std::string& bytes, std::size_t offset, std::uint32_t value, bool bigEndian) {
  std::string word;
  putWord(word, value, bigEndian);
  bytes.replace(offset, 4, word);
}

// A catalogue laid out as msgfmt lays it out: header, the two tables, then the strings, each
// with its terminating NUL. Entries are written in the order given (not necessarily sorted).
std::string makeMo(const Entries& entries, bool bigEndian, std::uint32_t revision = 0) {
  const auto count = static_cast<std::uint32_t>(entries.size());
  const std::uint32_t originals = 28;
  const std::uint32_t translations = originals + 8 * count;
  std::uint32_t next = translations + 8 * count;
  std::string tables;
  std::string strings;
  std::vector<std::pair<std::uint32_t, std::uint32_t>> originalEntries;
  std::vector<std::pair<std::uint32_t, std::uint32_t>> translationEntries;
  for (const auto& [id, text] : entries) {
    originalEntries.emplace_back(static_cast<std::uint32_t>(id.size()), next);
    strings += id + '\0';
    next += static_cast<std::uint32_t>(id.size() + 1);
  }
  for (const auto& [id, text] : entries) {
    translationEntries.emplace_back(static_cast<std::uint32_t>(text.size()), next);
    strings += text + '\0';
    next += static_cast<std::uint32_t>(text.size() + 1);
  }
  std::string out;
  putWord(out, 0x950412DEU, bigEndian);
  putWord(out, revision, bigEndian);
  putWord(out, count, bigEndian);
  putWord(out, originals, bigEndian);
  putWord(out, translations, bigEndian);
  putWord(out, 0, bigEndian);  // no hash table
  putWord(out, next, bigEndian);
  for (const auto& [length, offset] : originalEntries) {
    putWord(out, length, bigEndian);
    putWord(out, offset, bigEndian);
  }
  for (const auto& [length, offset] : translationEntries) {
    putWord(out, length, bigEndian);
    putWord(out, offset, bigEndian);
  }
  return out + strings;
}

const Entries kEntries = {
    {"", "Content-Type: text/plain; charset=UTF-8\n"},
    {"MSGID_ALARMDEVICE_CAPTION", "Voyant bleu"},
    {"B_SECOND", "zweite"},
    {std::string("ONE_LIGHT\0MANY_LIGHTS", 21), std::string("ein Licht\0viele Lichter", 23)},
    {"UNTRANSLATED", ""},
    {"A_FIRST", "erste \xC3\xA4"},
};

class MoByteOrder : public ::testing::TestWithParam<bool> {};

TEST_P(MoByteOrder, ReadsEveryEntry) {
  const auto catalogue = MoCatalogue::parse(makeMo(kEntries, GetParam()));
  ASSERT_TRUE(catalogue.has_value());
  ASSERT_NE(catalogue->find("MSGID_ALARMDEVICE_CAPTION"), nullptr);
  EXPECT_EQ(*catalogue->find("MSGID_ALARMDEVICE_CAPTION"), "Voyant bleu");
  EXPECT_EQ(*catalogue->find("A_FIRST"), "erste \xC3\xA4");
  EXPECT_EQ(*catalogue->find("B_SECOND"), "zweite");
  EXPECT_EQ(*catalogue->find("ONE_LIGHT"), "ein Licht") << "plural: singular id, first form";
  EXPECT_EQ(catalogue->find("UNTRANSLATED"), nullptr);
  EXPECT_EQ(catalogue->find(""), nullptr) << "the header entry is no message";
  EXPECT_EQ(catalogue->find("MISSING"), nullptr);
  EXPECT_EQ(catalogue->size(), 4u);
}

TEST_P(MoByteOrder, AcceptsRevisionOne) {
  EXPECT_TRUE(MoCatalogue::parse(makeMo(kEntries, GetParam(), 0x00010001)).has_value());
  EXPECT_FALSE(MoCatalogue::parse(makeMo(kEntries, GetParam(), 0x00020000)).has_value());
}

INSTANTIATE_TEST_SUITE_P(BothOrders, MoByteOrder, ::testing::Values(false, true),
                         [](const auto& info) {
                           return info.param ? "BigEndian" : "LittleEndian";
                         });

TEST(MoCatalogue, ReadsTheCompiledCatalogues) {
  const std::string dir = PLATFORM_TEST_BUILD_LOCALEDIR;
  const struct {
    const char* language;
    const char* caption;
  } expected[] = {{"en", "Blue Light"}, {"de", "Blaue Leuchte"}, {"fr", "Voyant bleu"}};
  for (const auto& language : expected) {
    const auto catalogue = MoCatalogue::parse(testsupport::readFile(
        dir + "/" + language.language + "/LC_MESSAGES/bluelightprofileprovider.mo"));
    ASSERT_TRUE(catalogue.has_value()) << language.language;
    ASSERT_NE(catalogue->find("MSGID_ALARMDEVICE_CAPTION"), nullptr);
    EXPECT_EQ(*catalogue->find("MSGID_ALARMDEVICE_CAPTION"), language.caption);
  }
}

TEST(MoCatalogue, FirstOfRepeatedIdsWins) {
  const auto catalogue = MoCatalogue::parse(makeMo({{"X", "first"}, {"X", "second"}}, false));
  ASSERT_TRUE(catalogue.has_value());
  EXPECT_EQ(*catalogue->find("X"), "first");
}

TEST(MoCatalogue, RejectsWhatIsNotACatalogue) {
  EXPECT_FALSE(MoCatalogue::parse("").has_value());
  EXPECT_FALSE(MoCatalogue::parse("msgid \"x\"\nmsgstr \"y\"\n").has_value());
  std::string badMagic = makeMo(kEntries, false);
  badMagic[0] = 'X';
  EXPECT_FALSE(MoCatalogue::parse(badMagic).has_value());
  EXPECT_FALSE(MoCatalogue::parse(makeMo(kEntries, false).substr(0, 27)).has_value());
}

TEST(MoCatalogue, RejectsTablesAndStringsOutsideTheFile) {
  for (const bool bigEndian : {false, true}) {
    const std::string good = makeMo(kEntries, bigEndian);
    std::string hugeCount = good;
    setWord(hugeCount, 8, 0xFFFFFFFFU, bigEndian);
    EXPECT_FALSE(MoCatalogue::parse(hugeCount).has_value());

    std::string originalsPastEnd = good;
    setWord(originalsPastEnd, 12, 0xFFFFFFF0U, bigEndian);
    EXPECT_FALSE(MoCatalogue::parse(originalsPastEnd).has_value());

    std::string translationsPastEnd = good;
    setWord(translationsPastEnd, 16, static_cast<std::uint32_t>(good.size() - 4), bigEndian);
    EXPECT_FALSE(MoCatalogue::parse(translationsPastEnd).has_value());

    std::string stringPastEnd = good;
    setWord(stringPastEnd, 28 + 8 + 4, static_cast<std::uint32_t>(good.size()), bigEndian);
    setWord(stringPastEnd, 28 + 8, 1, bigEndian);
    EXPECT_FALSE(MoCatalogue::parse(stringPastEnd).has_value());

    std::string lengthWraps = good;
    setWord(lengthWraps, 28 + 8, 0xFFFFFFFFU, bigEndian);
    EXPECT_FALSE(MoCatalogue::parse(lengthWraps).has_value());
  }
}

TEST(MoCatalogue, SurvivesEveryTruncation) {
  const std::string good = makeMo(kEntries, false);
  for (std::size_t length = 0; length < good.size(); ++length) {
    const auto catalogue = MoCatalogue::parse(good.substr(0, length));
    if (catalogue) {
      // What survives must still be a consistent catalogue.
      (void)catalogue->find("MSGID_ALARMDEVICE_CAPTION");
    }
  }
  EXPECT_TRUE(MoCatalogue::parse(good).has_value());
}

TEST(MoCatalogue, SurvivesRandomDamage) {
  std::mt19937 random(20240611);
  const std::string good = makeMo(kEntries, true);
  for (int round = 0; round < 20000; ++round) {
    std::string damaged = good;
    const int flips = 1 + static_cast<int>(random() % 8);
    for (int i = 0; i < flips; ++i) {
      damaged[random() % damaged.size()] = static_cast<char>(random() & 0xFF);
    }
    if (const auto catalogue = MoCatalogue::parse(damaged)) {
      (void)catalogue->find("B_SECOND");
    }
  }
  SUCCEED();
}

}  // namespace
