// Object paths as text: reading what a user types on the command line (with an explanation of
// what is wrong when it cannot be read) and writing the paths the providers return.
//
// The form is the usual CIM one:
//
//   [//host/][namespace:]ClassName[.Key=value[,Key=value]...]
//
// Values are quoted strings ("Blue Light:1.2", with \" \\ \n \t \r \b \f \' and \xH..HHHH
// escapes), whole numbers (42, -7), reals (2.5, 1e3) or TRUE/FALSE in any case. A quoted value
// that is itself a complete path with keys is a reference, which is how association keys such
// as ManagedElement are written. Blanks are allowed around "=" and ",".
#pragma once

#include <cmpihost/value.h>

#include <string>
#include <string_view>

namespace bluelight::cli {

/// Reads a path. A path without a namespace gets `defaultNamespace` (references nested in keys
/// keep none, which matches any namespace). Throws UsageError naming what is wrong and where.
cmpihost::ObjectPathValue parseObjectPath(std::string_view text,
                                          const std::string& defaultNamespace);

/// Reads a class name, optionally with its namespace ("root/cimv2:KESTA_BlueLight"). Throws
/// UsageError when the text is not that, also when it carries keys.
cmpihost::ObjectPathValue parseClassPath(std::string_view text,
                                         const std::string& defaultNamespace);

/// True when `text` is a CIM name: a letter or "_" followed by letters, digits and "_".
bool isCimName(std::string_view text);

/// The text form of a path, the host and namespace included when the path has them. Strings and
/// references are quoted with the escapes above, so the text is one line and reads back with
/// parseObjectPath to an equal path.
std::string formatPath(const cmpihost::ObjectPathValue& path);

/// A key value as formatPath writes it.
std::string formatKeyValue(const cmpihost::Value& value);

}  // namespace bluelight::cli
