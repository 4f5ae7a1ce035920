// Small text helpers shared by the value model, the recorder and the object functions.
#pragma once

#include <string>
#include <string_view>

namespace cmpihost::detail {

/// The text in double quotes, with backslash and double quote escaped (and control characters
/// written as \n, \t, \r or \xHH) so that the quoted form can be read back unambiguously.
std::string quoted(std::string_view text);

/// The shortest decimal text that reads back as the same double.
std::string formatReal(double value);

/// ASCII lower case, for case-insensitive keys.
std::string lowerCase(std::string_view text);

/// A C string for recording: the text itself, or "(null)" for a null pointer.
std::string textOrNull(const char* text);

}  // namespace cmpihost::detail
