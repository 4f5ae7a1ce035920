// The platform's locale and resource functions: localised message texts looked up in message
// catalogues (gettext .mo files compiled from the .po files in platform/po/).
#ifndef KESTA_PLATFORM_LOCALE_H
#define KESTA_PLATFORM_LOCALE_H

#include <string>

namespace Kesta {
namespace Locale {

// Kinds of resource library that getResourceLibrary can name.
enum ResourceKind : int {
  kResourceKindMessages = 2,  // the message catalogue of a language
};

// The language of this process: KESTA_LANGUAGE when set and not empty, else the first two
// letters of LC_ALL, LC_MESSAGES or LANG (the first of them that is set and not empty, ignoring
// "C" and "POSIX"), else "en". Always two lower-case letters.
std::string getLanguageId();

// The path of the resource library of `kind` for `languageId`. For kResourceKindMessages this is
// the compiled catalogue of that language, searched next to the provider library (build tree),
// under the installed locale directory, and under the compiled-in install prefix; when the
// language has no catalogue the English catalogue is named. Empty when nothing is found or for an
// unknown kind.
std::wstring getResourceLibrary(int kind, const std::string& languageId);

}  // namespace Locale

// One message text of a resource library. When the library cannot be read or does not hold
// `messageId`, the English text built into the platform is used, and failing that the message
// id itself, so a lookup always yields some text.
class ResourceString {
 public:
  ResourceString(const std::wstring& resourceLibrary, const std::wstring& messageId);

  const std::wstring& str() const { return text_; }
  // Implicit, as the callers pass a resource string wherever a message text is taken.
  operator const std::wstring&() const { return text_; }  // NOLINT(google-explicit-constructor)

 private:
  std::wstring text_;
};

// A wide string as UTF-8.
std::string make_string(const std::wstring& text);

}  // namespace Kesta

#endif  // KESTA_PLATFORM_LOCALE_H
