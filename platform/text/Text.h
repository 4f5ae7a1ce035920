// Text helpers shared by the platform layer: ASCII case folding, UTF-8 conversions and a
// printable form of untrusted text for log lines.
#ifndef KESTA_PLATFORM_TEXT_TEXT_H
#define KESTA_PLATFORM_TEXT_TEXT_H

#include <cstddef>
#include <string>
#include <string_view>

namespace Kesta {
namespace platform {

// Case folding for names that are ASCII by definition (CIM names, LED colours and functions,
// language codes). Locale-aware folding would make "I" and "i" differ under a Turkish locale.
constexpr char asciiLower(char c) noexcept { return c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : c; }
bool equalsIgnoringCase(std::string_view first, std::string_view second) noexcept;
std::string asciiLowerCopy(std::string_view text);

// True when `text` is well-formed UTF-8 (no overlong forms, no surrogates, nothing past
// U+10FFFF).
bool isValidUtf8(std::string_view text) noexcept;

// The length of the well-formed UTF-8 sequence at the start of `text` (1 to 4), or 0 when the
// bytes there are not one.
std::size_t utf8SequenceLength(std::string_view text) noexcept;
// Appends the UTF-8 form of `codePoint` (U+FFFD for what is not a Unicode scalar value).
void appendUtf8(std::string& out, char32_t codePoint);

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
