#include "text.h"

#include <charconv>

namespace cmpihost::detail {

std::string formatReal(double value) {
  char buffer[64];
  const auto result = std::to_chars(buffer, buffer + sizeof buffer, value);
  return std::string(buffer, result.ptr);
}

std::string textOrNull(const char* text) { return text != nullptr ? std::string(text) : "(null)"; }

}  // namespace cmpihost::detail
