// The small text forms that paths, MOF and the messages share: quoted strings with their escapes
// and numbers written the way they read back.
#pragma once

#include <string>
#include <string_view>

#include "text/Text.h"

namespace bluelight::cli {

/// `text` in double quotes with MOF escapes: \" and \\ for quote and backslash, \n \t \r \b \f for
/// those controls, \xHHHH for every other control character and DEL. Other bytes (UTF-8 included)
/// are kept as they are, so the result is one line. The tool writes every quoted text in this one
/// form (paths, MOF output, messages), the library's QuoteStyle::kMof, because it is what the
/// tool reads back in paths; the host's records use the shorter \xHH form instead.
inline std::string quote(std::string_view text) {
  return Kesta::platform::quoted(text, Kesta::platform::QuoteStyle::kMof);
}

/// The shortest decimal text that reads back to the same value, always with a decimal point or
/// an exponent so it reads as a real ("2.0", "0.1", "1e+30"). `single` rounds to real32 first.
std::string realText(double value, bool single);

}  // namespace bluelight::cli
