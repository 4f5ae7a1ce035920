#include <cmpihost/status.h>
#include <cmpihost/value.h>

#include <utility>

#include "text.h"

namespace cmpihost {

namespace {

// CMPI_chars is how providers pass strings in; stored, it is a string like in an object manager.
CMPIType normalizedType(CMPIType type) {
  if (type == CMPI_chars) return CMPI_string;
  if (type == CMPI_charsA) return CMPI_stringA;
  return type;
}

bool isUnsignedType(CMPIType type) {
  return type == CMPI_uint8 || type == CMPI_uint16 || type == CMPI_uint32 || type == CMPI_uint64 ||
         type == CMPI_char16;
}

bool isSignedType(CMPIType type) {
  return type == CMPI_sint8 || type == CMPI_sint16 || type == CMPI_sint32 || type == CMPI_sint64;
}

[[noreturn]] void badAccess(const char* wanted, CMPIType type, bool null) {
  throw BadValueAccess(std::string("Value: ") + wanted + " requested from a " +
                       (null ? "null " : "") + typeName(type) + " value");
}

}  // namespace

// ---- Value ----------------------------------------------------------------------------------

template <class T>
Value Value::make(CMPIType type, T data) {
  Value value;
  value.type_ = type;
  value.null_ = false;
  value.payload_.emplace<T>(std::move(data));
  return value;
}

Value::Value(const char* text) : type_(CMPI_string) {
  if (text != nullptr) {
    null_ = false;
    payload_.emplace<std::string>(text);
  }
}

Value::Value(std::string text) : type_(CMPI_string), null_(false) {
  payload_.emplace<std::string>(std::move(text));
}

Value::Value(ObjectPathValue path) : type_(CMPI_ref), null_(false) {
  payload_.emplace<std::shared_ptr<const ObjectPathValue>>(
      std::make_shared<const ObjectPathValue>(std::move(path)));
}

Value::Value(InstanceValue instance) : type_(CMPI_instance), null_(false) {
  payload_.emplace<std::shared_ptr<const InstanceValue>>(
      std::make_shared<const InstanceValue>(std::move(instance)));
}

Value Value::null(CMPIType type) {
  Value value;
  value.type_ = normalizedType(type);
  return value;
}

Value Value::boolean(bool v) { return make<bool>(CMPI_boolean, v); }
Value Value::char16(CMPIChar16 v) { return make<CMPIUint64>(CMPI_char16, v); }
Value Value::uint8(CMPIUint8 v) { return make<CMPIUint64>(CMPI_uint8, v); }
Value Value::uint16(CMPIUint16 v) { return make<CMPIUint64>(CMPI_uint16, v); }
Value Value::uint32(CMPIUint32 v) { return make<CMPIUint64>(CMPI_uint32, v); }
Value Value::uint64(CMPIUint64 v) { return make<CMPIUint64>(CMPI_uint64, v); }
Value Value::sint8(CMPISint8 v) { return make<CMPISint64>(CMPI_sint8, v); }
Value Value::sint16(CMPISint16 v) { return make<CMPISint64>(CMPI_sint16, v); }
Value Value::sint32(CMPISint32 v) { return make<CMPISint64>(CMPI_sint32, v); }
Value Value::sint64(CMPISint64 v) { return make<CMPISint64>(CMPI_sint64, v); }
Value Value::real32(CMPIReal32 v) { return make<double>(CMPI_real32, v); }
Value Value::real64(CMPIReal64 v) { return make<double>(CMPI_real64, v); }
Value Value::string(std::string v) { return Value(std::move(v)); }
Value Value::dateTime(std::string cimText) {
  return make<std::string>(CMPI_dateTime, std::move(cimText));
}
Value Value::reference(ObjectPathValue path) { return Value(std::move(path)); }
Value Value::instance(InstanceValue instance) { return Value(std::move(instance)); }

Value Value::array(CMPIType elementType, std::vector<Value> elements) {
  const CMPIType element = normalizedType(static_cast<CMPIType>(elementType & ~CMPI_ARRAY));
  return make<std::shared_ptr<const Elements>>(
      static_cast<CMPIType>(element | CMPI_ARRAY),
      std::make_shared<const Elements>(std::move(elements)));
}

bool Value::asBoolean() const {
  if (null_ || type_ != CMPI_boolean) badAccess("a boolean", type_, null_);
  return std::get<bool>(payload_);
}

CMPIUint64 Value::asUnsigned() const {
  if (null_ || !isUnsignedType(type_)) badAccess("an unsigned integer", type_, null_);
  return std::get<CMPIUint64>(payload_);
}

CMPISint64 Value::asSigned() const {
  if (null_ || !isSignedType(type_)) badAccess("a signed integer", type_, null_);
  return std::get<CMPISint64>(payload_);
}

double Value::asReal() const {
  if (null_ || (type_ != CMPI_real32 && type_ != CMPI_real64)) badAccess("a real", type_, null_);
  return std::get<double>(payload_);
}

const std::string& Value::asString() const {
  if (null_ || (type_ != CMPI_string && type_ != CMPI_dateTime)) {
    badAccess("a string", type_, null_);
  }
  return std::get<std::string>(payload_);
}

const ObjectPathValue& Value::asReference() const {
  if (null_ || type_ != CMPI_ref) badAccess("a reference", type_, null_);
  return *std::get<std::shared_ptr<const ObjectPathValue>>(payload_);
}

const InstanceValue& Value::asInstance() const {
  if (null_ || type_ != CMPI_instance) badAccess("an instance", type_, null_);
  return *std::get<std::shared_ptr<const InstanceValue>>(payload_);
}

const std::vector<Value>& Value::elements() const {
  if (null_ || !isArray()) badAccess("array elements", type_, null_);
  return *std::get<std::shared_ptr<const Elements>>(payload_);
}

std::string Value::toString() const {
  if (null_) return "NULL";
  if (isArray()) {
    std::string text = "{";
    bool first = true;
    for (const Value& element : elements()) {
      if (!first) text += ", ";
      first = false;
      text += element.toString();
    }
    return text + "}";
  }
  switch (type_) {
    case CMPI_boolean:
      return asBoolean() ? "true" : "false";
    case CMPI_char16: {
      const CMPIUint64 code = asUnsigned();
      if (code >= 0x20 && code < 0x7F) {
        return std::string("'") + static_cast<char>(code) + "'";
      }
      return std::to_string(code);
    }
    case CMPI_string:
    case CMPI_dateTime:
      return detail::quoted(asString());
    case CMPI_ref:
      return detail::quoted(asReference().toString());
    case CMPI_instance:
      return asInstance().toString();
    case CMPI_real32:
    case CMPI_real64:
      return detail::formatReal(asReal());
    default:
      break;
  }
  if (isUnsignedType(type_)) return std::to_string(asUnsigned());
  if (isSignedType(type_)) return std::to_string(asSigned());
  return "<" + typeName(type_) + ">";
}

bool operator==(const Value& a, const Value& b) {
  if (a.type_ != b.type_ || a.null_ != b.null_) return false;
  if (a.null_) return true;
  if (a.payload_.index() != b.payload_.index()) return false;
  if (a.isArray()) return a.elements() == b.elements();
  switch (a.type_) {
    case CMPI_ref:
      return a.asReference() == b.asReference();
    case CMPI_instance:
      return a.asInstance() == b.asInstance();
    default:
      return a.payload_ == b.payload_;
  }
}

std::ostream& operator<<(std::ostream& out, const Value& value) { return out << value.toString(); }

// ---- Keys and properties ----------------------------------------------------------------------

bool operator==(const KeyBinding& a, const KeyBinding& b) {
  return a.name == b.name && a.value == b.value;
}
bool operator!=(const KeyBinding& a, const KeyBinding& b) { return !(a == b); }

bool operator==(const Property& a, const Property& b) {
  return a.name == b.name && a.value == b.value;
}
bool operator!=(const Property& a, const Property& b) { return !(a == b); }

}  // namespace cmpihost
