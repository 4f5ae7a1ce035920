#include "text/Text.h"

#include <cstddef>
#include <cstdint>

namespace Kesta {
namespace platform {

namespace {

constexpr char32_t kReplacement = 0xFFFD;

// Decodes one UTF-8 sequence at the start of `text`. Returns its length and stores the code
// point, or returns 0 when the bytes there are not a well-formed sequence.
std::size_t decodeOne(std::string_view text, char32_t& codePoint) noexcept {
  const auto byte = [&](std::size_t i) { return static_cast<unsigned char>(text[i]); };
  const unsigned char lead = byte(0);
  if (lead < 0x80) {
    codePoint = lead;
    return 1;
  }
  std::size_t length = 0;
  char32_t value = 0;
  char32_t minimum = 0;
  if (lead >= 0xC2 && lead <= 0xDF) {
    length = 2;
    value = lead & 0x1F;
    minimum = 0x80;
  } else if (lead >= 0xE0 && lead <= 0xEF) {
    length = 3;
    value = lead & 0x0F;
    minimum = 0x800;
  } else if (lead >= 0xF0 && lead <= 0xF4) {
    length = 4;
    value = lead & 0x07;
    minimum = 0x10000;
  } else {
    return 0;
  }
  if (text.size() < length) {
    return 0;
  }
  for (std::size_t i = 1; i < length; ++i) {
    if ((byte(i) & 0xC0) != 0x80) {
      return 0;
    }
    value = (value << 6) | (byte(i) & 0x3F);
  }
  if (value < minimum || value > 0x10FFFF || (value >= 0xD800 && value <= 0xDFFF)) {
    return 0;
  }
  codePoint = value;
  return length;
}

// Appends `prefix` and the last `digits` hex digits of `value`.
void appendHexEscape(std::string& out, const char* prefix, unsigned int value, int digits,
                     bool upperCase) {
  static constexpr char kUpper[] = "0123456789ABCDEF";
  static constexpr char kLower[] = "0123456789abcdef";
  const char* const digitChars = upperCase ? kUpper : kLower;
  out += prefix;
  for (int shift = 4 * (digits - 1); shift >= 0; shift -= 4) {
    out.push_back(digitChars[(value >> shift) & 0x0F]);
  }
}

void appendHexByte(std::string& out, unsigned char byte) {
  appendHexEscape(out, "\\x", byte, 2, true);
}

// Appends the escape of a control character that has no escape of its own in any style.
void appendControlEscape(std::string& out, unsigned char byte, QuoteStyle style) {
  switch (style) {
    case QuoteStyle::kHexBytes:
      appendHexByte(out, byte);
      return;
    case QuoteStyle::kMof:
      appendHexEscape(out, "\\x", byte, 4, true);
      return;
    case QuoteStyle::kJson:
      appendHexEscape(out, "\\u", byte, 4, false);
      return;
  }
}

// A wchar_t holds UTF-32 on the platforms this builds for; read it as an unsigned code point
// whatever the signedness of wchar_t.
char32_t codePointOf(wchar_t c) { return static_cast<char32_t>(static_cast<std::uint32_t>(c)); }

// Decodes UTF-8 into a wide string; each byte that is not part of a well-formed sequence becomes
// what `badByte` makes of it.
template <typename BadByte>
std::wstring decodeToWide(std::string_view text, BadByte badByte) {
  std::wstring out;
  out.reserve(text.size());
  while (!text.empty()) {
    char32_t codePoint = 0;
    const std::size_t length = decodeOne(text, codePoint);
    if (length == 0) {
      out.push_back(badByte(static_cast<unsigned char>(text.front())));
      text.remove_prefix(1);
      continue;
    }
    out.push_back(static_cast<wchar_t>(codePoint));
    text.remove_prefix(length);
  }
  return out;
}

}  // namespace

void appendUtf8(std::string& out, char32_t codePoint) {
  if (codePoint > 0x10FFFF || (codePoint >= 0xD800 && codePoint <= 0xDFFF)) {
    codePoint = kReplacement;
  }
  if (codePoint < 0x80) {
    out.push_back(static_cast<char>(codePoint));
  } else if (codePoint < 0x800) {
    out.push_back(static_cast<char>(0xC0 | (codePoint >> 6)));
    out.push_back(static_cast<char>(0x80 | (codePoint & 0x3F)));
  } else if (codePoint < 0x10000) {
    out.push_back(static_cast<char>(0xE0 | (codePoint >> 12)));
    out.push_back(static_cast<char>(0x80 | ((codePoint >> 6) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | (codePoint & 0x3F)));
  } else {
    out.push_back(static_cast<char>(0xF0 | (codePoint >> 18)));
    out.push_back(static_cast<char>(0x80 | ((codePoint >> 12) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | ((codePoint >> 6) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | (codePoint & 0x3F)));
  }
}

void appendUtf8KeepingSurrogates(std::string& out, char16_t unit) {
  if (unit >= 0xD800 && unit <= 0xDFFF) {
    // The three-byte pattern of any value below U+10000, which appendUtf8 refuses for these.
    out.push_back(static_cast<char>(0xE0 | (unit >> 12)));
    out.push_back(static_cast<char>(0x80 | ((unit >> 6) & 0x3F)));
    out.push_back(static_cast<char>(0x80 | (unit & 0x3F)));
    return;
  }
  appendUtf8(out, unit);
}

std::size_t utf8SequenceLength(std::string_view text) noexcept {
  char32_t ignored = 0;
  return text.empty() ? 0 : decodeOne(text, ignored);
}

bool equalsIgnoringCase(std::string_view first, std::string_view second) noexcept {
  if (first.size() != second.size()) {
    return false;
  }
  for (std::size_t i = 0; i < first.size(); ++i) {
    if (asciiLower(first[i]) != asciiLower(second[i])) {
      return false;
    }
  }
  return true;
}

std::string asciiLowerCopy(std::string_view text) {
  std::string result(text);
  for (char& c : result) {
    c = asciiLower(c);
  }
  return result;
}

bool isValidUtf8(std::string_view text) noexcept {
  while (!text.empty()) {
    char32_t codePoint = 0;
    const std::size_t length = decodeOne(text, codePoint);
    if (length == 0) {
      return false;
    }
    text.remove_prefix(length);
  }
  return true;
}

std::string quoted(std::string_view text, QuoteStyle style) {
  std::string out;
  out.reserve(text.size() + 2);
  out += '"';
  for (const char c : text) {
    const auto byte = static_cast<unsigned char>(c);
    switch (c) {
      case '"':
        out += "\\\"";
        break;
      case '\\':
        out += "\\\\";
        break;
      case '\n':
        out += "\\n";
        break;
      case '\t':
        out += "\\t";
        break;
      case '\r':
        out += "\\r";
        break;
      case '\b':
      case '\f':
        if (style == QuoteStyle::kMof) {
          out += c == '\b' ? "\\b" : "\\f";
        } else {
          appendControlEscape(out, byte, style);
        }
        break;
      default:
        if (byte < 0x20 || (byte == 0x7F && style == QuoteStyle::kMof)) {
          appendControlEscape(out, byte, style);
        } else {
          out += c;
        }
    }
  }
  out += '"';
  return out;
}

std::string printable(std::string_view text) {
  std::string out;
  out.reserve(text.size());
  while (!text.empty()) {
    char32_t codePoint = 0;
    const std::size_t length = decodeOne(text, codePoint);
    if (length == 0 || codePoint < 0x20 || codePoint == 0x7F) {
      appendHexByte(out, static_cast<unsigned char>(text.front()));
      text.remove_prefix(1);
      continue;
    }
    out.append(text.data(), length);
    text.remove_prefix(length);
  }
  return out;
}

std::string utf8FromWide(std::wstring_view text) {
  std::string out;
  out.reserve(text.size());
  for (const wchar_t c : text) {
    appendUtf8(out, codePointOf(c));
  }
  return out;
}

std::wstring wideFromUtf8(std::string_view text) {
  return decodeToWide(text, [](unsigned char) { return static_cast<wchar_t>(kReplacement); });
}

std::wstring wideFromPath(std::string_view path) {
  // Only bytes 0x80 to 0xFF can be ill-formed, so the escapes stay within U+DC80..U+DCFF.
  return decodeToWide(path, [](unsigned char byte) { return static_cast<wchar_t>(0xDC00 + byte); });
}

std::string pathFromWide(std::wstring_view path) {
  std::string out;
  out.reserve(path.size());
  for (const wchar_t c : path) {
    const char32_t codePoint = codePointOf(c);
    if (codePoint >= 0xDC80 && codePoint <= 0xDCFF) {
      out.push_back(static_cast<char>(codePoint - 0xDC00));
    } else {
      appendUtf8(out, codePoint);
    }
  }
  return out;
}

}  // namespace platform
}  // namespace Kesta
