#include <cmpihost/status.h>

#include <cstdio>
#include <utility>

namespace cmpihost {

StatusValue::StatusValue(CMPIrc code, std::optional<std::string> text)
    : rc(code), message(std::move(text)) {}

std::string StatusValue::toString() const {
  std::string text = rcName(rc);
  if (message) {
    text += ": ";
    text += *message;
  }
  return text;
}

bool operator==(const StatusValue& a, const StatusValue& b) {
  return a.rc == b.rc && a.message == b.message;
}

bool operator!=(const StatusValue& a, const StatusValue& b) { return !(a == b); }

std::ostream& operator<<(std::ostream& out, const StatusValue& status) {
  return out << status.toString();
}

std::string rcName(CMPIrc rc) {
  switch (rc) {
    case CMPI_RC_OK:
      return "CMPI_RC_OK";
    case CMPI_RC_ERR_FAILED:
      return "CMPI_RC_ERR_FAILED";
    case CMPI_RC_ERR_ACCESS_DENIED:
      return "CMPI_RC_ERR_ACCESS_DENIED";
    case CMPI_RC_ERR_INVALID_NAMESPACE:
      return "CMPI_RC_ERR_INVALID_NAMESPACE";
    case CMPI_RC_ERR_INVALID_PARAMETER:
      return "CMPI_RC_ERR_INVALID_PARAMETER";
    case CMPI_RC_ERR_INVALID_CLASS:
      return "CMPI_RC_ERR_INVALID_CLASS";
    case CMPI_RC_ERR_NOT_FOUND:
      return "CMPI_RC_ERR_NOT_FOUND";
    case CMPI_RC_ERR_NOT_SUPPORTED:
      return "CMPI_RC_ERR_NOT_SUPPORTED";
    case CMPI_RC_ERR_CLASS_HAS_CHILDREN:
      return "CMPI_RC_ERR_CLASS_HAS_CHILDREN";
    case CMPI_RC_ERR_CLASS_HAS_INSTANCES:
      return "CMPI_RC_ERR_CLASS_HAS_INSTANCES";
    case CMPI_RC_ERR_INVALID_SUPERCLASS:
      return "CMPI_RC_ERR_INVALID_SUPERCLASS";
    case CMPI_RC_ERR_ALREADY_EXISTS:
      return "CMPI_RC_ERR_ALREADY_EXISTS";
    case CMPI_RC_ERR_NO_SUCH_PROPERTY:
      return "CMPI_RC_ERR_NO_SUCH_PROPERTY";
    case CMPI_RC_ERR_TYPE_MISMATCH:
      return "CMPI_RC_ERR_TYPE_MISMATCH";
    case CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED:
      return "CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED";
    case CMPI_RC_ERR_INVALID_QUERY:
      return "CMPI_RC_ERR_INVALID_QUERY";
    case CMPI_RC_ERR_METHOD_NOT_AVAILABLE:
      return "CMPI_RC_ERR_METHOD_NOT_AVAILABLE";
    case CMPI_RC_ERR_METHOD_NOT_FOUND:
      return "CMPI_RC_ERR_METHOD_NOT_FOUND";
    case CMPI_RC_DO_NOT_UNLOAD:
      return "CMPI_RC_DO_NOT_UNLOAD";
    case CMPI_RC_NEVER_UNLOAD:
      return "CMPI_RC_NEVER_UNLOAD";
    case CMPI_RC_ERR_INVALID_HANDLE:
      return "CMPI_RC_ERR_INVALID_HANDLE";
    case CMPI_RC_ERR_INVALID_DATA_TYPE:
      return "CMPI_RC_ERR_INVALID_DATA_TYPE";
    case CMPI_RC_ERROR_SYSTEM:
      return "CMPI_RC_ERROR_SYSTEM";
    case CMPI_RC_ERROR:
      return "CMPI_RC_ERROR";
  }
  return "CMPI_RC_" + std::to_string(static_cast<unsigned>(rc));
}

namespace {

// The element names; group names (CMPI_SIMPLE, CMPI_UINT, ...) share values with their first
// member and are deliberately not listed.
const char* scalarTypeName(CMPIType type) {
  switch (type) {
    case CMPI_null:
      return "CMPI_null";
    case CMPI_boolean:
      return "CMPI_boolean";
    case CMPI_char16:
      return "CMPI_char16";
    case CMPI_real32:
      return "CMPI_real32";
    case CMPI_real64:
      return "CMPI_real64";
    case CMPI_uint8:
      return "CMPI_uint8";
    case CMPI_uint16:
      return "CMPI_uint16";
    case CMPI_uint32:
      return "CMPI_uint32";
    case CMPI_uint64:
      return "CMPI_uint64";
    case CMPI_sint8:
      return "CMPI_sint8";
    case CMPI_sint16:
      return "CMPI_sint16";
    case CMPI_sint32:
      return "CMPI_sint32";
    case CMPI_sint64:
      return "CMPI_sint64";
    case CMPI_instance:
      return "CMPI_instance";
    case CMPI_ref:
      return "CMPI_ref";
    case CMPI_args:
      return "CMPI_args";
    case CMPI_class:
      return "CMPI_class";
    case CMPI_filter:
      return "CMPI_filter";
    case CMPI_enumeration:
      return "CMPI_enumeration";
    case CMPI_string:
      return "CMPI_string";
    case CMPI_chars:
      return "CMPI_chars";
    case CMPI_dateTime:
      return "CMPI_dateTime";
    case CMPI_ptr:
      return "CMPI_ptr";
    case CMPI_charsptr:
      return "CMPI_charsptr";
    default:
      return nullptr;
  }
}

}  // namespace

std::string typeName(CMPIType type) {
  const bool array = (type & CMPI_ARRAY) != 0;
  const CMPIType element = static_cast<CMPIType>(type & ~CMPI_ARRAY);
  const char* name = scalarTypeName(element);
  if (name == nullptr || (array && element == CMPI_null)) {
    char buffer[32];
    std::snprintf(buffer, sizeof buffer, "CMPI_type_0x%04x", static_cast<unsigned>(type));
    return buffer;
  }
  std::string text = name;
  if (array) text += 'A';
  return text;
}

}  // namespace cmpihost
