#include "MofFormat.h"

#include <cstdio>
#include <string>

#include "PathText.h"
#include "TextForms.h"

namespace bluelight::cli {

using cmpihost::InstanceValue;
using cmpihost::Value;

namespace {

std::string charLiteral(CMPIUint64 code) {
  if (code == '\'') return "'\\''";
  if (code == '\\') return "'\\\\'";
  if (code >= 0x20 && code < 0x7f) return "'" + std::string(1, static_cast<char>(code)) + "'";
  char text[16];
  std::snprintf(text, sizeof text, "'\\x%04X'", static_cast<unsigned int>(code & 0xFFFF));
  return text;
}

// An embedded instance on one line, as the text of a string value.
std::string inlineInstance(const InstanceValue& instance) {
  std::string text = "instance of " + instance.className() + " {";
  for (const cmpihost::Property& property : instance.properties()) {
    text += " " + property.name + " = " + mofValue(property.value) + ";";
  }
  return text + " }";
}

}  // namespace

std::string mofValue(const Value& value) {
  if (value.isNull()) return "NULL";
  if (value.isArray()) {
    std::string text = "{";
    const char* separator = "";
    for (const Value& element : value.elements()) {
      text += separator + mofValue(element);
      separator = ", ";
    }
    return text + "}";
  }
  // Only embedded instances and char16 are written differently in MOF than in a key of an
  // object path; every other value is written the same way in both.
  switch (value.type()) {
    case CMPI_instance:
      return quote(inlineInstance(value.asInstance()));
    case CMPI_char16:
      return charLiteral(value.asUnsigned());
    default:
      return formatKeyValue(value);
  }
}

std::string mofInstance(const InstanceValue& instance, bool pathComment) {
  std::string text;
  if (pathComment) text += "// " + formatPath(instance.path()) + "\n";
  text += "instance of " + instance.className() + "\n{\n";
  for (const cmpihost::Property& property : instance.properties()) {
    text += "    " + property.name + " = " + mofValue(property.value) + ";\n";
  }
  text += "};\n";
  return text;
}

}  // namespace bluelight::cli
