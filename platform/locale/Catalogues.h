// Where the caption catalogues are and how they are loaded; the pieces of Kesta::Locale that
// tests look at directly.
#ifndef KESTA_PLATFORM_LOCALE_CATALOGUES_H
#define KESTA_PLATFORM_LOCALE_CATALOGUES_H

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "locale/MoCatalogue.h"

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

// The parsed catalogue in the file at `path`, or null when it cannot be read or is not a
// catalogue. Parsed catalogues are kept, keyed by path and checked against the file's device,
// inode, size and modification time on every call, so a replaced file is read again and an
// unchanged one costs one stat().
std::shared_ptr<const MoCatalogue> loadCatalogue(const std::string& path);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_LOCALE_CATALOGUES_H
