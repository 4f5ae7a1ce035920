// The caption catalogues: which language, which file, and the texts in it.
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cstdlib>
#include <filesystem>
#include <mutex>
#include <string>
#include <system_error>
#include <unordered_map>
#include <utility>

#include "KestaLocale.h"
#include "locale/BuildConfig.h"
#include "locale/Catalogues.h"
#include "os/BinaryLocation.h"
#include "os/FileIo.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

constexpr const char* kFallbackLanguage = "en";
// Real catalogues are a few hundred bytes; the limit only keeps a wrong file from being read.
constexpr std::size_t kCatalogueLimit = std::size_t{4} * 1024 * 1024;
// Only a handful of paths are ever looked up; the limit bounds the cache if callers pass many.
constexpr std::size_t kMaxCachedCatalogues = 64;

// The texts used when no catalogue can be read, so that a caption is English rather than a
// message id even on a broken installation.
struct BuiltInText {
  const char* messageId;
  const wchar_t* text;
};
constexpr std::array<BuiltInText, 1> kBuiltInEnglish = {{
    {"MSGID_ALARMDEVICE_CAPTION", L"Blue Light"},
}};

bool isRegularFile(const std::string& path) {
  struct stat info = {};
  return systemFileSystem()->statAt(kWorkingDirectory, path, info) == 0 && S_ISREG(info.st_mode);
}

CatalogueCache& catalogueCache() {
  static CatalogueCache cache;
  return cache;
}

const std::vector<std::string>& searchedDirectories() {
  // dladdr walks the loader's lists under its lock; the answer cannot change, so ask once.
  static const std::vector<std::string> directories = catalogueDirectories(ownBinaryDirectory());
  return directories;
}

std::optional<std::wstring> translatedText(const std::wstring& resourceLibrary,
                                           const std::string& messageId) {
  if (resourceLibrary.empty()) {
    return std::nullopt;
  }
  try {
    const std::shared_ptr<const MoCatalogue> catalogue =
        loadCatalogue(pathFromWide(resourceLibrary));
    if (catalogue != nullptr) {
      if (const std::string* text = catalogue->find(messageId)) {
        return wideFromUtf8(*text);
      }
    }
  } catch (const std::exception&) {
    // Out of memory while reading a catalogue: the built-in text below still serves.
  }
  return std::nullopt;
}

}  // namespace

CatalogueCache::FileStamp::FileStamp(const struct stat& info)
    : device(info.st_dev),
      inode(info.st_ino),
      size(info.st_size),
      modifiedSeconds(info.st_mtim.tv_sec),
      modifiedNanoseconds(info.st_mtim.tv_nsec) {}

bool CatalogueCache::FileStamp::operator==(const FileStamp& other) const {
  return device == other.device && inode == other.inode && size == other.size &&
         modifiedSeconds == other.modifiedSeconds &&
         modifiedNanoseconds == other.modifiedNanoseconds;
}

CatalogueCache::CatalogueCache(std::shared_ptr<FileSystem> files) : files_(std::move(files)) {}

std::shared_ptr<const MoCatalogue> CatalogueCache::get(const std::string& path) {
  struct stat info = {};
  if (files_->statAt(kWorkingDirectory, path, info) != 0 || !S_ISREG(info.st_mode)) {
    return nullptr;
  }
  const FileStamp current(info);
  {
    std::lock_guard<std::mutex> lock(mutex_);
    const auto found = entries_.find(path);
    if (found != entries_.end() && found->second.stamp == current) {
      return found->second.catalogue;
    }
  }
  // Read and parse without holding the lock; two threads may both load a changed file, and
  // the later one simply replaces the earlier entry.
  const ReadResult read = readRegularFile(*files_, path, kCatalogueLimit);
  std::shared_ptr<const MoCatalogue> catalogue;
  if (read.ok()) {
    if (std::optional<MoCatalogue> parsed = MoCatalogue::parse(read.data)) {
      catalogue = std::make_shared<const MoCatalogue>(std::move(*parsed));
    }
  }
  // A file that is not a catalogue is remembered too, so it is not parsed again on every
  // lookup until it changes.
  const FileStamp stamp = read.ok() ? FileStamp(read.info) : current;
  std::lock_guard<std::mutex> lock(mutex_);
  if (entries_.size() >= kMaxCachedCatalogues && entries_.count(path) == 0) {
    entries_.clear();
  }
  entries_.insert_or_assign(path, Entry{stamp, catalogue});
  return catalogue;
}

std::string messageDomain() { return BLUELIGHT_MESSAGE_DOMAIN; }

std::vector<std::string> catalogueDirectories(const std::string& binaryDirectory) {
  std::vector<std::string> directories;
  const auto add = [&directories](const std::filesystem::path& directory) {
    std::string normal = directory.lexically_normal().string();
    while (normal.size() > 1 && normal.back() == '/') {
      normal.pop_back();
    }
    if (std::find(directories.begin(), directories.end(), normal) == directories.end()) {
      directories.push_back(std::move(normal));
    }
  };
  if (!binaryDirectory.empty()) {
    const std::filesystem::path binary(binaryDirectory);
    add(binary / ".." / "share" / "locale");
    add(binary / BLUELIGHT_LOCALEDIR_FROM_LIBDIR);
  }
  add(BLUELIGHT_INSTALL_FULL_LOCALEDIR);
  return directories;
}

std::optional<std::string> languageCode(std::string_view value) {
  const std::string_view base = value.substr(0, value.find_first_of(".@"));
  if (base == "C" || base == "POSIX") {
    return std::nullopt;
  }
  const auto isLetter = [](char c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z'); };
  if (value.size() < 2 || !isLetter(value[0]) || !isLetter(value[1])) {
    return std::nullopt;
  }
  return asciiLowerCopy(value.substr(0, 2));
}

std::shared_ptr<const MoCatalogue> loadCatalogue(const std::string& path) {
  return catalogueCache().get(path);
}

}  // namespace platform

namespace Locale {

std::string getLanguageId() {
  for (const char* variable : {"KESTA_LANGUAGE", "LC_ALL", "LC_MESSAGES", "LANG"}) {
    const char* value = std::getenv(variable);
    if (value == nullptr || *value == '\0') {
      continue;
    }
    if (std::optional<std::string> code = platform::languageCode(value)) {
      return *code;
    }
  }
  return platform::kFallbackLanguage;
}

std::wstring getResourceLibrary(int kind, const std::string& languageId) {
  if (kind != kResourceKindMessages) {
    return std::wstring();
  }
  try {
    // Only two letters ever reach the path, so a language id cannot point anywhere else.
    const std::string language =
        platform::languageCode(languageId).value_or(platform::kFallbackLanguage);
    const std::string fileName = "/LC_MESSAGES/" + platform::messageDomain() + ".mo";
    for (const std::string& candidate : {language, std::string(platform::kFallbackLanguage)}) {
      for (const std::string& directory : platform::searchedDirectories()) {
        const std::string path =
            std::string(directory).append("/").append(candidate).append(fileName);
        if (platform::isRegularFile(path)) {
          return platform::wideFromPath(path);
        }
      }
    }
  } catch (const std::exception&) {
    // Only memory can run out here; the caller then gets the built-in English text.
  }
  return std::wstring();
}

}  // namespace Locale

ResourceString::ResourceString(const std::wstring& resourceLibrary, const std::wstring& messageId) {
  const std::string id = platform::utf8FromWide(messageId);
  if (std::optional<std::wstring> text = platform::translatedText(resourceLibrary, id)) {
    text_ = std::move(*text);
    return;
  }
  for (const platform::BuiltInText& builtIn : platform::kBuiltInEnglish) {
    if (id == builtIn.messageId) {
      text_ = builtIn.text;
      return;
    }
  }
  text_ = messageId;
}

std::string make_string(const std::wstring& text) { return platform::utf8FromWide(text); }

}  // namespace Kesta
