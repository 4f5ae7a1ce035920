// Instances and values in MOF, the text form object managers and their tools show instances in.
#pragma once

#include <cmpihost/value.h>

#include <string>

namespace bluelight::cli {

/// A value as a MOF initializer: NULL, TRUE/FALSE, numbers, strings and date/times in double
/// quotes with MOF escapes, char16 in single quotes, references as their quoted path text,
/// embedded instances as their quoted one-line MOF, arrays as {a, b}.
std::string mofValue(const cmpihost::Value& value);

/// An instance declaration, one property per line indented by four blanks, ending with "};" and
/// a newline. With `pathComment` it is preceded by a "// <object path>" line.
std::string mofInstance(const cmpihost::InstanceValue& instance, bool pathComment = true);

}  // namespace bluelight::cli
