// The caption catalogue: language choice, catalogue paths, look-ups, fall-backs and UTF-8.
#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <filesystem>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "FakeFileSystem.h"
#include "KestaLocale.h"
#include "PlatformTestSupport.h"
#include "locale/Catalogues.h"
#include "text/Text.h"

namespace {

using Kesta::make_string;
using Kesta::ResourceString;
using Kesta::Locale::getLanguageId;
using Kesta::Locale::getResourceLibrary;
using Kesta::platform::CatalogueCache;
using platform_test::FakeFileSystem;
using platform_test::writeFileIn;
using testsupport::ScopedEnv;
using testsupport::TempDir;

const std::wstring kCaptionId = L"MSGID_ALARMDEVICE_CAPTION";
const std::string kBuildLocaleDir = PLATFORM_TEST_BUILD_LOCALEDIR;

std::string builtCatalogue(const std::string& language) {
  return kBuildLocaleDir + "/" + language + "/LC_MESSAGES/bluelightprofileprovider.mo";
}

// The four variables that choose the language, all cleared unless a test sets them.
class LanguageEnvironment {
 public:
  LanguageEnvironment(const std::optional<std::string>& kesta,
                      const std::optional<std::string>& all,
                      const std::optional<std::string>& messages,
                      const std::optional<std::string>& lang)
      : kesta_("KESTA_LANGUAGE", kesta),
        all_("LC_ALL", all),
        messages_("LC_MESSAGES", messages),
        lang_("LANG", lang) {}

 private:
  ScopedEnv kesta_;
  ScopedEnv all_;
  ScopedEnv messages_;
  ScopedEnv lang_;
};

struct LanguageCase {
  std::optional<std::string> kesta;
  std::optional<std::string> all;
  std::optional<std::string> messages;
  std::optional<std::string> lang;
  std::string expected;
};

class LanguageChoice : public ::testing::TestWithParam<LanguageCase> {};

TEST_P(LanguageChoice, FollowsThePrecedence) {
  const LanguageCase& c = GetParam();
  LanguageEnvironment environment(c.kesta, c.all, c.messages, c.lang);
  EXPECT_EQ(getLanguageId(), c.expected);
}

const std::optional<std::string> kUnset;

INSTANTIATE_TEST_SUITE_P(
    Table, LanguageChoice,
    ::testing::Values(LanguageCase{kUnset, kUnset, kUnset, kUnset, "en"},
                      LanguageCase{"", "", "", "", "en"},
                      LanguageCase{"de", kUnset, kUnset, kUnset, "de"},
                      LanguageCase{"FR_fr", kUnset, kUnset, kUnset, "fr"},
                      LanguageCase{"de", "fr_FR.UTF-8", "en_US", "en_GB", "de"},
                      LanguageCase{kUnset, "fr_FR.UTF-8", "de_DE", "en_GB", "fr"},
                      LanguageCase{"", "fr_FR.UTF-8", "de_DE", "en_GB", "fr"},
                      LanguageCase{kUnset, kUnset, "de_DE@euro", "fr_FR", "de"},
                      LanguageCase{kUnset, "", "", "fr_CA.UTF-8", "fr"},
                      LanguageCase{kUnset, "C", "de_DE", "fr_FR", "de"},
                      LanguageCase{kUnset, "C.UTF-8", kUnset, "fr_FR", "fr"},
                      LanguageCase{kUnset, "POSIX", "POSIX", "POSIX", "en"},
                      LanguageCase{kUnset, kUnset, kUnset, "C", "en"},
                      LanguageCase{"1x", kUnset, kUnset, "de", "de"},
                      LanguageCase{"e", kUnset, kUnset, kUnset, "en"},
                      LanguageCase{kUnset, kUnset, kUnset, "ZH_tw", "zh"}));

TEST(Locale, LanguageCodeOnlyEverYieldsTwoLetters) {
  EXPECT_EQ(Kesta::platform::languageCode("de_DE.UTF-8"), "de");
  EXPECT_EQ(Kesta::platform::languageCode("../../etc/x"), std::nullopt);
  EXPECT_EQ(Kesta::platform::languageCode("d/"), std::nullopt);
  EXPECT_EQ(Kesta::platform::languageCode("\xC3\xA4x"), std::nullopt);
  EXPECT_EQ(Kesta::platform::languageCode("POSIX.UTF-8"), std::nullopt);
}

TEST(Locale, ResourceLibraryIsTheBuiltCatalogue) {
  for (const std::string language : {"en", "de", "fr"}) {
    const std::string found = Kesta::platform::pathFromWide(getResourceLibrary(2, language));
    ASSERT_FALSE(found.empty()) << language;
    EXPECT_TRUE(std::filesystem::equivalent(found, builtCatalogue(language))) << found;
  }
}

TEST(Locale, ResourceLibraryFallsBackToEnglish) {
  const std::wstring english = getResourceLibrary(2, "en");
  EXPECT_EQ(getResourceLibrary(2, "xx"), english);
  EXPECT_EQ(getResourceLibrary(2, ""), english);
  EXPECT_EQ(getResourceLibrary(2, "../../../etc/passwd"), english);
  EXPECT_EQ(getResourceLibrary(2, "DE"), getResourceLibrary(2, "de"));
}

TEST(Locale, ResourceLibraryOfAnotherKindIsEmpty) {
  EXPECT_EQ(getResourceLibrary(1, "en"), L"");
  EXPECT_EQ(getResourceLibrary(3, "de"), L"");
}

struct CaptionCase {
  std::string language;
  std::wstring caption;
};

class Captions : public ::testing::TestWithParam<CaptionCase> {};

TEST_P(Captions, InEachLanguage) {
  const ResourceString caption(getResourceLibrary(2, GetParam().language), kCaptionId);
  EXPECT_EQ(caption.str(), GetParam().caption);
  const std::wstring& asReference = caption;
  EXPECT_EQ(asReference, GetParam().caption);
}

INSTANTIATE_TEST_SUITE_P(Table, Captions,
                         ::testing::Values(CaptionCase{"en", L"Blue Light"},
                                           CaptionCase{"de", L"Blaue Leuchte"},
                                           CaptionCase{"fr", L"Voyant bleu"},
                                           CaptionCase{"xx", L"Blue Light"},
                                           CaptionCase{"", L"Blue Light"}));

TEST(Locale, TheModulesChainFromTheEnvironment) {
  LanguageEnvironment environment(kUnset, kUnset, kUnset, "de_DE.UTF-8");
  const std::string caption =
      make_string(ResourceString(getResourceLibrary(2, getLanguageId()), kCaptionId).str());
  EXPECT_EQ(caption, "Blaue Leuchte");
}

TEST(Locale, WithoutACatalogueTheBuiltInEnglishServes) {
  EXPECT_EQ(ResourceString(L"", kCaptionId).str(), L"Blue Light");
  EXPECT_EQ(ResourceString(L"/no/such/catalogue.mo", kCaptionId).str(), L"Blue Light");
}

TEST(Locale, AnUnknownMessageIsItsOwnId) {
  EXPECT_EQ(ResourceString(getResourceLibrary(2, "de"), L"MSGID_NOT_THERE").str(),
            L"MSGID_NOT_THERE");
  EXPECT_EQ(ResourceString(L"", L"MSGID_NOT_THERE").str(), L"MSGID_NOT_THERE");
}

TEST(Locale, ACorruptCatalogueFallsBackToEnglish) {
  TempDir dir;
  writeFileIn(dir.file("garbage.mo"), "this is not a catalogue at all, not even close");
  const std::string german = testsupport::readFile(builtCatalogue("de"));
  writeFileIn(dir.file("truncated.mo"), german.substr(0, german.size() / 2));
  for (const std::string name : {"garbage.mo", "truncated.mo"}) {
    const std::wstring library = Kesta::platform::wideFromPath(dir.file(name));
    EXPECT_EQ(ResourceString(library, kCaptionId).str(), L"Blue Light") << name;
    EXPECT_EQ(ResourceString(library, kCaptionId).str(), L"Blue Light") << name << " (cached)";
  }
  const std::wstring folder = Kesta::platform::wideFromPath(dir.path());
  EXPECT_EQ(ResourceString(folder, kCaptionId).str(), L"Blue Light");
}

TEST(Locale, AReplacedCatalogueIsReadAgain) {
  TempDir dir;
  const std::string path = dir.file("caption.mo");
  const std::wstring library = Kesta::platform::wideFromPath(path);
  writeFileIn(path, testsupport::readFile(builtCatalogue("de")));
  EXPECT_EQ(ResourceString(library, kCaptionId).str(), L"Blaue Leuchte");
  writeFileIn(path, testsupport::readFile(builtCatalogue("fr")));
  EXPECT_EQ(ResourceString(library, kCaptionId).str(), L"Voyant bleu");
  writeFileIn(path, "broken now");
  EXPECT_EQ(ResourceString(library, kCaptionId).str(), L"Blue Light");
}

TEST(Locale, CataloguesInAFolderWithNonUtf8Bytes) {
  TempDir dir;
  const std::string path = dir.file("caf\xE9/fr.mo");
  writeFileIn(path, testsupport::readFile(builtCatalogue("fr")));
  EXPECT_EQ(ResourceString(Kesta::platform::wideFromPath(path), kCaptionId).str(), L"Voyant bleu");
}

TEST(Locale, MakeStringWritesUtf8) {
  EXPECT_EQ(make_string(L"Blue Light"), "Blue Light");
  EXPECT_EQ(make_string(L"Blaue Leuchte \u00E4\u00F6\u00FC\u00DF"),
            "Blaue Leuchte \xC3\xA4\xC3\xB6\xC3\xBC\xC3\x9F");
  EXPECT_EQ(make_string(L"Voyant bleu \u00E9 \u20AC \U0001F4A1"),
            "Voyant bleu \xC3\xA9 \xE2\x82\xAC \xF0\x9F\x92\xA1");
  EXPECT_EQ(make_string(L""), "");
  std::wstring lone;
  lone.push_back(static_cast<wchar_t>(0xDC80));
  EXPECT_EQ(make_string(lone), "\xEF\xBF\xBD");
}

TEST(Locale, SearchedFoldersForBuildAndInstalledLayouts) {
  const auto build = Kesta::platform::catalogueDirectories("/work/build/bin");
  ASSERT_FALSE(build.empty());
  EXPECT_EQ(build.front(), "/work/build/share/locale");
  EXPECT_EQ(build.back(), PLATFORM_TEST_INSTALL_LOCALEDIR);

  const auto installed = Kesta::platform::catalogueDirectories(PLATFORM_TEST_INSTALL_LIBDIR);
  EXPECT_NE(std::find(installed.begin(), installed.end(), PLATFORM_TEST_INSTALL_LOCALEDIR),
            installed.end());
  for (std::size_t i = 0; i < installed.size(); ++i) {
    for (std::size_t j = i + 1; j < installed.size(); ++j) {
      EXPECT_NE(installed[i], installed[j]);
    }
  }

  const auto nothing = Kesta::platform::catalogueDirectories("");
  EXPECT_EQ(nothing, (std::vector<std::string>{PLATFORM_TEST_INSTALL_LOCALEDIR}));
}

// The caption of a catalogue the cache gave, or "(none)".
std::string captionIn(const std::shared_ptr<const Kesta::platform::MoCatalogue>& catalogue) {
  if (catalogue == nullptr) {
    return "(none)";
  }
  const std::string* text = catalogue->find("MSGID_ALARMDEVICE_CAPTION");
  return text != nullptr ? *text : "(no caption)";
}

TEST(CatalogueCache, AnUnchangedCatalogueCostsOneStat) {
  const auto files = std::make_shared<FakeFileSystem>();
  files->addFile("/share/locale/de.mo", testsupport::readFile(builtCatalogue("de")));
  CatalogueCache cache(files);
  EXPECT_EQ(captionIn(cache.get("/share/locale/de.mo")), "Blaue Leuchte");
  EXPECT_EQ(captionIn(cache.get("/share/locale/de.mo")), "Blaue Leuchte");
  EXPECT_EQ(files->count(FakeFileSystem::Call::StatAt, "/share/locale/de.mo"), 2u);
  EXPECT_EQ(files->count(FakeFileSystem::Call::Open, "/share/locale/de.mo"), 1u);
  // Rewritten: read again.
  files->addFile("/share/locale/de.mo", testsupport::readFile(builtCatalogue("fr")));
  EXPECT_EQ(captionIn(cache.get("/share/locale/de.mo")), "Voyant bleu");
  EXPECT_EQ(files->count(FakeFileSystem::Call::Open, "/share/locale/de.mo"), 2u);
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(CatalogueCache, ACatalogueThatCannotBeReadIsNone) {
  const auto files = std::make_shared<FakeFileSystem>();
  files->addFile("/l/locked.mo", testsupport::readFile(builtCatalogue("de")));
  files->addFile("/l/failing.mo", testsupport::readFile(builtCatalogue("de")));
  files->fail(FakeFileSystem::Call::Open, "/l/locked.mo", EACCES);
  files->fail(FakeFileSystem::Call::Read, "/l/failing.mo", EIO, 1);
  files->fail(FakeFileSystem::Call::StatAt, "/l/hidden.mo", EACCES);
  CatalogueCache cache(files);
  EXPECT_EQ(captionIn(cache.get("/l/locked.mo")), "(none)");
  EXPECT_EQ(captionIn(cache.get("/l/failing.mo")), "(none)");
  EXPECT_EQ(captionIn(cache.get("/l/hidden.mo")), "(none)");
  EXPECT_EQ(captionIn(cache.get("/l")), "(none)");
  // Once the file changes it is read again.
  files->addFile("/l/failing.mo", testsupport::readFile(builtCatalogue("fr")));
  EXPECT_EQ(captionIn(cache.get("/l/failing.mo")), "Voyant bleu");
  EXPECT_EQ(files->openDescriptors(), 0u);
}

TEST(Locale, ConcurrentLookups) {
  const std::vector<std::pair<std::string, std::wstring>> expected = {
      {"en", L"Blue Light"}, {"de", L"Blaue Leuchte"}, {"fr", L"Voyant bleu"}};
  std::vector<std::thread> threads;
  threads.reserve(6);
  std::atomic<int> wrong{0};
  for (int t = 0; t < 6; ++t) {
    threads.emplace_back([&expected, &wrong, t] {
      for (int i = 0; i < 300; ++i) {
        const auto& [language, caption] = expected[(t + i) % expected.size()];
        if (ResourceString(getResourceLibrary(2, language), kCaptionId).str() != caption) {
          ++wrong;
        }
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(wrong.load(), 0);
}

}  // namespace
