// The text helpers of the whole project, one function a job: ASCII case folding, UTF-8 checks
// and encoding, quoting in the three forms the project writes, a printable form of untrusted
// text for log lines, and the wide forms of text and paths. The platform, the in-process host,
// the command-line tool, the computer-system provider and the tests all use these; the library
// needs nothing but the standard library (no CMPI), so any of them can link it.
#ifndef KESTA_PLATFORM_TEXT_TEXT_H
#define KESTA_PLATFORM_TEXT_TEXT_H

#include <cstddef>
#include <string>
#include <string_view>

namespace Kesta {
namespace platform {

// Case folding for names that are ASCII by definition (CIM names of classes, properties, keys and
// namespaces, DNS names, LED colours and functions, language codes): only A-Z fold, every other
// byte compares as it is. It does not depend on the process's locale, which an object manager
// may set: locale-aware folding (tolower, strcasecmp) would make "I" and "i" differ under a
// Turkish locale.
constexpr char asciiLower(char c) noexcept {
  return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}
// True when the two texts are equal but for the case of A-Z.
bool equalsIgnoringCase(std::string_view first, std::string_view second) noexcept;
// `text` with A-Z in lower case, for keys of case-insensitive maps.
std::string asciiLowerCopy(std::string_view text);

// True when `text` is well-formed UTF-8 (no overlong forms, no surrogates, nothing past
// U+10FFFF).
bool isValidUtf8(std::string_view text) noexcept;

// The length of the well-formed UTF-8 sequence at the start of `text` (1 to 4), or 0 when the
// bytes there are not one.
std::size_t utf8SequenceLength(std::string_view text) noexcept;
// Appends the UTF-8 form of `codePoint` (U+FFFD for what is not a Unicode scalar value).
void appendUtf8(std::string& out, char32_t codePoint);
// Appends a 16-bit code unit (a CIM char16, or a \x escape of up to four hex digits) in UTF-8
// form, one to three bytes. Unlike appendUtf8, a surrogate (U+D800..U+DFFF) is not replaced but
// written as its three-byte form: the tool hands such a value on exactly as the user or the
// provider gave it, even though those bytes are not well-formed UTF-8.
void appendUtf8KeepingSurrogates(std::string& out, char16_t unit);

// The escapes quoted() writes. Every style puts the text in double quotes, writes \" and \\ for
// the quote and the backslash and \n \t \r for those three controls, and keeps every other byte
// as it is (UTF-8 included), so the result is one line that reads back unambiguously. The styles
// differ only in the remaining controls:
//
//   style      backspace, form feed   other controls below U+0020    DEL (U+007F)
//   kHexBytes  \x08 \x0C              \xHH, 2 upper-case digits      kept
//   kMof       \b \f                  \xHHHH, 4 upper-case digits    \x007F
//   kJson      \u0008 \u000c          \u00hh, 4 lower-case digits    kept
//
// kHexBytes is the form of the host's records and value texts, kMof that of a MOF string literal
// (the tool's paths, MOF output and messages), kJson that of a JSON string (the trees the tests
// write). What each writes is part of recordings, tool output and test expectations, so a style
// is never changed in place: another form would be another style.
enum class QuoteStyle { kHexBytes, kMof, kJson };

// `text` in double quotes with the escapes of `style`.
std::string quoted(std::string_view text, QuoteStyle style);

// `text` with control characters and bytes that are not part of well-formed UTF-8 written as
// \xHH, so that a path or a parser message taken from outside can never break a log line in two
// or put raw bytes into it.
std::string printable(std::string_view text);

// UTF-8 of a wide (UTF-32) string; code points that are not Unicode scalar values (surrogates,
// anything past U+10FFFF) become U+FFFD.
std::string utf8FromWide(std::wstring_view text);
// A wide string from UTF-8; every byte that does not belong to a well-formed sequence becomes
// U+FFFD.
std::wstring wideFromUtf8(std::string_view text);

// A file path carried in a wide string and back again without loss: bytes that are not
// well-formed UTF-8 travel as U+DC80..U+DCFF (the usual "surrogate escape"), which no valid text
// contains.
std::wstring wideFromPath(std::string_view path);
std::string pathFromWide(std::wstring_view path);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_TEXT_TEXT_H
