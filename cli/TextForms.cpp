#include "TextForms.h"

#include <charconv>
#include <cmath>
#include <cstdio>

namespace bluelight::cli {

std::string quote(std::string_view text) {
  std::string out;
  out.reserve(text.size() + 2);
  out += '"';
  for (const char c : text) {
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
        out += "\\b";
        break;
      case '\f':
        out += "\\f";
        break;
      default: {
        const auto byte = static_cast<unsigned char>(c);
        if (byte < 0x20 || byte == 0x7f) {
          char escaped[8];
          std::snprintf(escaped, sizeof escaped, "\\x%04X", byte);
          out += escaped;
        } else {
          out += c;
        }
      }
    }
  }
  out += '"';
  return out;
}

std::string realText(double value, bool single) {
  if (std::isnan(value)) return "NaN";
  if (std::isinf(value)) return value < 0 ? "-Infinity" : "Infinity";
  char buffer[64];
  const std::to_chars_result written =
      single ? std::to_chars(buffer, buffer + sizeof buffer, static_cast<float>(value))
             : std::to_chars(buffer, buffer + sizeof buffer, value);
  std::string text(buffer, written.ptr);
  // "2" would read back as an integer; a real keeps its decimal point.
  if (text.find_first_of(".e") == std::string::npos) text += ".0";
  return text;
}

}  // namespace bluelight::cli
