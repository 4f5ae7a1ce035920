#include <string>

#include "KestaCommonBase.h"

namespace Kesta {

std::string stripSpaces(std::string text) {
  static constexpr const char* kBlanks = " \t\r\n\v\f";
  const std::string::size_type last = text.find_last_not_of(kBlanks);
  if (last == std::string::npos) {
    return std::string();
  }
  text.erase(last + 1);
  text.erase(0, text.find_first_not_of(kBlanks));
  return text;
}

}  // namespace Kesta
