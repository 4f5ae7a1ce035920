// Where the caption catalogues are and how they are loaded; the pieces of Kesta::Locale that
// tests look at directly.
#ifndef KESTA_PLATFORM_LOCALE_CATALOGUES_H
#define KESTA_PLATFORM_LOCALE_CATALOGUES_H

#include <sys/stat.h>

#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "locale/MoCatalogue.h"
#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

// The gettext domain of the catalogues: <localedir>/<lang>/LC_MESSAGES/<domain>.mo.
std::string messageDomain();

// The locale directories searched, in order, for a binary in `binaryDirectory`:
//   <binaryDirectory>/../share/locale          (build tree: build/lib and build/bin)
//   <binaryDirectory>/<localedir from libdir>  (an installation, wherever its prefix now is)
//   the compiled-in CMAKE_INSTALL_FULL_LOCALEDIR
// normalised, without repeats. Without a binary directory only the last one remains.
std::vector<std::string> catalogueDirectories(const std::string& binaryDirectory);

// The two lower-case letters of a language id ("de_DE.UTF-8" -> "de"), or nothing when it does
// not start with two ASCII letters or names the C or POSIX locale.
std::optional<std::string> languageCode(std::string_view value);

// Parsed catalogues, kept by path and checked against the file's device, inode, size and
// modification time on every look-up, so a replaced file is read again and an unchanged one
// costs one stat(). The files are examined and read through the given file system.
class CatalogueCache {
 public:
  explicit CatalogueCache(std::shared_ptr<FileSystem> files = systemFileSystem());
  ~CatalogueCache() = default;
  CatalogueCache(const CatalogueCache&) = delete;
  CatalogueCache& operator=(const CatalogueCache&) = delete;

  // The parsed catalogue in the file at `path`, or null when it cannot be read or is not a
  // catalogue. Safe to call from several threads at once.
  std::shared_ptr<const MoCatalogue> get(const std::string& path);

 private:
  // What identifies one version of a file well enough to reuse what was parsed from it.
  struct FileStamp {
    dev_t device = 0;
    ino_t inode = 0;
    off_t size = 0;
    long long modifiedSeconds = 0;
    long modifiedNanoseconds = 0;

    explicit FileStamp(const struct stat& info);
    bool operator==(const FileStamp& other) const;
  };
  struct Entry {
    FileStamp stamp;
    std::shared_ptr<const MoCatalogue> catalogue;  // null: the file is not a catalogue
  };

  std::shared_ptr<FileSystem> files_;
  std::mutex mutex_;
  std::unordered_map<std::string, Entry> entries_;  // guarded by mutex_
};

// The parsed catalogue in the file at `path`, from the process's one cache over the real file
// system; null when it cannot be read or is not a catalogue.
std::shared_ptr<const MoCatalogue> loadCatalogue(const std::string& path);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_LOCALE_CATALOGUES_H
