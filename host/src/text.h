// Small text helpers shared by the value model, the recorder and the object functions. Quoting,
// case folding and UTF-8 come from the project's text library (platform/text/Text.h); what is
// here is the host's own choice among them and the forms only the host writes.
#pragma once

#include <string>
#include <string_view>

#include "text/Text.h"

namespace cmpihost {

// CIM compares the names of classes, properties, keys and namespaces ignoring ASCII case; the
// host does so everywhere with the library's comparison, and keys its case-insensitive maps with
// the library's lower-case copy.
using Kesta::platform::asciiLowerCopy;
using Kesta::platform::equalsIgnoringCase;

namespace detail {

/// The text in double quotes as the host's records and value texts write it: backslash, double
/// quote, \n, \t and \r escaped and every other control character below U+0020 as \xHH, so the
/// quoted form reads back unambiguously. This is the library's QuoteStyle::kHexBytes; recordings
/// and test expectations hold its output, so the host keeps it rather than the tool's MOF form.
inline std::string quoted(std::string_view text) {
  return Kesta::platform::quoted(text, Kesta::platform::QuoteStyle::kHexBytes);
}

/// The shortest decimal text that reads back as the same double.
std::string formatReal(double value);

/// A C string for recording: the text itself, or "(null)" for a null pointer.
std::string textOrNull(const char* text);

}  // namespace detail
}  // namespace cmpihost
