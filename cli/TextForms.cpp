#include "TextForms.h"

#include <charconv>
#include <cmath>

namespace bluelight::cli {

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
