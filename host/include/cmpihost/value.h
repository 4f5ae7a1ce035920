// The value model: CIM values, object paths and instances as plain C++ values.
//
// Everything a provider hands to the broker is copied into these types, so tests can compare and
// print results long after the CMPI objects behind them were freed. They are ordinary values:
// copyable, comparable with ==, printable with <<, and safe to share between threads (the nested
// parts of a Value are immutable and shared, so copying a Value is cheap).
#pragma once

#include <cmpidt.h>

#include <cstddef>
#include <memory>
#include <optional>
#include <ostream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

namespace cmpihost {

class ObjectPathValue;
class InstanceValue;

/// Thrown by the typed accessors of Value when the value is null or of another kind.
class BadValueAccess : public std::logic_error {
 public:
  using std::logic_error::logic_error;
};

/// One CIM value: a CMPI type code, a null flag and the data.
///
/// Integers are kept as 64-bit numbers and reals as double, with the type code telling which CMPI
/// type they are; strings are std::string; date/times are their 25-character CIM text; references
/// and embedded instances are ObjectPathValue / InstanceValue; arrays are a list of Values of the
/// element type. CMPI_chars never appears here: like an object manager, the host stores a
/// CMPI_chars value as CMPI_string (and CMPI_charsA as CMPI_stringA).
class Value {
 public:
  /// A null value without a type (CMPI_null).
  Value() = default;
  /// A string value (CMPI_string); a null pointer gives a null string.
  // The four below are implicit on purpose: a test writes set("Name", "x") as a client would.
  Value(const char* text);  // NOLINT(google-explicit-constructor)
  Value(std::string text);  // NOLINT(google-explicit-constructor)
  /// A reference (CMPI_ref).
  Value(ObjectPathValue path);  // NOLINT(google-explicit-constructor)
  /// An embedded instance (CMPI_instance).
  Value(InstanceValue instance);  // NOLINT(google-explicit-constructor)
  // Integers must name their CMPI type (Value::uint16(3)); these would silently pick one.
  Value(int) = delete;
  Value(std::nullptr_t) = delete;

  /// A null value of the given type (CMPI_chars is stored as CMPI_string).
  static Value null(CMPIType type = CMPI_null);
  static Value boolean(bool v);
  static Value char16(CMPIChar16 v);
  static Value uint8(CMPIUint8 v);
  static Value uint16(CMPIUint16 v);
  static Value uint32(CMPIUint32 v);
  static Value uint64(CMPIUint64 v);
  static Value sint8(CMPISint8 v);
  static Value sint16(CMPISint16 v);
  static Value sint32(CMPISint32 v);
  static Value sint64(CMPISint64 v);
  static Value real32(CMPIReal32 v);
  static Value real64(CMPIReal64 v);
  static Value string(std::string v);
  /// A date/time in CIM text form ("yyyymmddhhmmss.mmmmmm+utc" or "ddddddddhhmmss.mmmmmm:000").
  static Value dateTime(std::string cimText);
  static Value reference(ObjectPathValue path);
  static Value instance(InstanceValue instance);
  /// An array of `elementType` (without the CMPI_ARRAY bit; CMPI_chars becomes CMPI_string). The
  /// elements should be of that type or null.
  static Value array(CMPIType elementType, std::vector<Value> elements);

  CMPIType type() const { return type_; }
  bool isNull() const { return null_; }
  bool isArray() const { return (type_ & CMPI_ARRAY) != 0; }
  /// The type without the CMPI_ARRAY bit.
  CMPIType elementType() const { return static_cast<CMPIType>(type_ & ~CMPI_ARRAY); }

  // Typed access. Each throws BadValueAccess when the value is null or of another kind.
  bool asBoolean() const;
  /// uint8 to uint64 and char16.
  CMPIUint64 asUnsigned() const;
  /// sint8 to sint64.
  CMPISint64 asSigned() const;
  /// real32 and real64.
  double asReal() const;
  /// string and dateTime.
  const std::string& asString() const;
  const ObjectPathValue& asReference() const;
  const InstanceValue& asInstance() const;
  const std::vector<Value>& elements() const;

  /// The value as CIM text: NULL, true/false, numbers, "quoted strings" (double quotes and
  /// backslashes escaped with a backslash), references as their quoted path text, instances as
  /// "instance of ... { ... }", arrays as {a, b}.
  std::string toString() const;

  friend bool operator==(const Value& a, const Value& b);
  friend bool operator!=(const Value& a, const Value& b) { return !(a == b); }

 private:
  using Elements = std::vector<Value>;
  using Payload =
      std::variant<std::monostate, bool, CMPIUint64, CMPISint64, double, std::string,
                   std::shared_ptr<const ObjectPathValue>, std::shared_ptr<const InstanceValue>,
                   std::shared_ptr<const Elements>>;

  // Builds the data in place; moving a whole Payload into place trips a false uninitialized-use
  // warning of GCC 12 at -O2.
  template <class T>
  static Value make(CMPIType type, T data);

  CMPIType type_ = CMPI_null;
  bool null_ = true;
  Payload payload_;
};

std::ostream& operator<<(std::ostream& out, const Value& value);

/// One key of an object path.
struct KeyBinding {
  std::string name;
  Value value;
};

bool operator==(const KeyBinding& a, const KeyBinding& b);
bool operator!=(const KeyBinding& a, const KeyBinding& b);

/// How much of an object path toString() writes.
enum class PathText {
  Full,         ///< //host/namespace:Class.keys (the host part only when there is a host)
  WithoutHost,  ///< namespace:Class.keys
  ClassAndKeys  ///< Class.keys
};

/// A CIM object path: namespace, host, class name and keys in the order they were added.
///
/// Key lookup is case-insensitive, as CIM names are. operator== compares every part exactly (also
/// the key order and the case of names); equivalent() is the looser CIM comparison.
class ObjectPathValue {
 public:
  ObjectPathValue() = default;
  ObjectPathValue(std::string nameSpace, std::string className);

  const std::string& nameSpace() const { return nameSpace_; }
  const std::string& host() const { return host_; }
  const std::string& className() const { return className_; }
  const std::vector<KeyBinding>& keys() const { return keys_; }

  ObjectPathValue& setNameSpace(std::string nameSpace);
  ObjectPathValue& setHost(std::string host);
  ObjectPathValue& setClassName(std::string className);
  /// Adds a key, or replaces the value of a key of that name (any case) keeping its place.
  ObjectPathValue& addKey(std::string name, Value value);
  /// Removes the key of that name (any case); false when there was none.
  bool removeKey(std::string_view name);
  ObjectPathValue& clearKeys();

  /// The key of that name (any case), or null.
  const Value* findKey(std::string_view name) const;

  /// CIM text, e.g. root/cimv2:KESTA_BlueLight.CreationClassName="KESTA_BlueLight",DeviceID="x".
  /// Keys are written in their order; string and reference values are in double quotes, with
  /// double quotes and backslashes escaped by a backslash; other values as Value::toString() writes
  /// them; a path without keys ends after the class name.
  std::string toString(PathText form = PathText::Full) const;

  /// Reads the text that toString() writes. Quoted values become strings, except that a quoted
  /// value which is itself a complete path with keys becomes a reference; true/false become
  /// booleans, whole numbers sint64 and other numbers real64. nullopt when the text is malformed.
  static std::optional<ObjectPathValue> parse(std::string_view text);

  /// The CIM comparison: namespace, class and key names compared ignoring case, the key order and
  /// the host ignored, key values compared exactly (references with equivalent()).
  bool equivalent(const ObjectPathValue& other) const;

  friend bool operator==(const ObjectPathValue& a, const ObjectPathValue& b);
  friend bool operator!=(const ObjectPathValue& a, const ObjectPathValue& b) { return !(a == b); }

 private:
  std::string nameSpace_;
  std::string host_;
  std::string className_;
  std::vector<KeyBinding> keys_;
};

std::ostream& operator<<(std::ostream& out, const ObjectPathValue& path);

/// One property of an instance.
struct Property {
  std::string name;
  Value value;
};

bool operator==(const Property& a, const Property& b);
bool operator!=(const Property& a, const Property& b);

/// A CIM instance: its object path and its properties in the order they were first set.
///
/// Property lookup is case-insensitive. operator== compares the path and the properties in order.
class InstanceValue {
 public:
  InstanceValue() = default;
  explicit InstanceValue(ObjectPathValue path);

  const ObjectPathValue& path() const { return path_; }
  ObjectPathValue& path() { return path_; }
  InstanceValue& setPath(ObjectPathValue path);
  const std::string& className() const { return path_.className(); }

  const std::vector<Property>& properties() const { return properties_; }
  std::size_t propertyCount() const { return properties_.size(); }

  /// Sets a property; a property of that name (any case) keeps its place and gets the new value.
  InstanceValue& set(std::string name, Value value);
  /// Removes the property of that name (any case); false when there was none.
  bool remove(std::string_view name);
  /// The property of that name (any case), or null.
  const Value* find(std::string_view name) const;
  bool has(std::string_view name) const { return find(name) != nullptr; }

  /// "instance of Class (path text) { Name = value; ... }"; the path in brackets is left out when
  /// it holds no more than the class name. With `multiLine` one property per line.
  std::string toString(bool multiLine = false) const;

  friend bool operator==(const InstanceValue& a, const InstanceValue& b);
  friend bool operator!=(const InstanceValue& a, const InstanceValue& b) { return !(a == b); }

 private:
  ObjectPathValue path_;
  std::vector<Property> properties_;
};

std::ostream& operator<<(std::ostream& out, const InstanceValue& instance);

}  // namespace cmpihost
