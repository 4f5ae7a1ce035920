// The encapsulated object types of the host.
//
// Each type is a ManagedObject that embeds the C struct the provider sees ({hdl, ft}); the handle
// leads back to the C++ object (see Encapsulated). An object whose handle a fault has set to null
// cannot be reached through its table any more; its scope still owns and frees it. The data is
// kept as values of the value model; CMPI objects returned from getters (strings, paths, arrays
// ...) are made fresh in the current scope on each call, like the copies an object manager hands
// out, so a provider may release them or not.
//
// The table functions of each type live in the type's source file; they are static functions that
// look up the object, record the call, check the handle and forward to the methods here.
#pragma once

#include <cmpift.h>
#include <cmpihost/request.h>
#include <cmpihost/value.h>

#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "object_scope.h"

namespace cmpihost::detail {

class RequestState;

/// Common base of the encapsulated types. `Self` provides `static FT* table()`.
///
/// The handle of an object leads back to it (for most types it is the object itself; a string
/// keeps its characters there, see StringObject). A pointer handed to a table function is taken
/// for an object of ours only when its table is ours, its handle is not null and the object its
/// handle leads to has exactly that C struct. So a null handle (a faulted object), a struct copied
/// by value, or a foreign object is never read beyond its two members.
template <class Self, class CType, class FT>
class Encapsulated : public ManagedObject {
 public:
  using CmpiType = CType;

  CType* cmpi() { return &cmpi_; }
  const CType* cmpi() const { return &cmpi_; }
  bool hasHandle() const { return cmpi_.hdl != nullptr; }
  /// Makes the object look like one whose handle is null (fault injection); its table stays.
  void clearHandle() { cmpi_.hdl = nullptr; }

  /// The object behind a C pointer, or null when the pointer is null, not of this type, has a
  /// null handle, or is not the object's own struct.
  static Self* from(const CType* object) {
    if (object == nullptr || object->ft != Self::table() || object->hdl == nullptr) return nullptr;
    Self* self = Self::ownerOfHandle(object->hdl);
    return self->cmpi() == object ? self : nullptr;
  }

  /// The object a handle of this type leads to; StringObject hides this with its own.
  static Self* ownerOfHandle(void* handle) {
    return static_cast<Self*>(static_cast<ManagedObject*>(handle));
  }

 protected:
  explicit Encapsulated(ObjectScope& scope) : ManagedObject(scope) {
    cmpi_.hdl = static_cast<ManagedObject*>(this);
    cmpi_.ft = Self::table();
  }
  void setHandle(void* handle) { cmpi_.hdl = handle; }

 private:
  CType cmpi_;
};

/// Names in order with case-insensitive lookup (context entries, method arguments).
class NamedValues {
 public:
  void set(std::string name, Value value);
  const Value* find(std::string_view name) const;
  std::size_t size() const { return entries_.size(); }
  const Property& at(std::size_t index) const { return entries_[index]; }

 private:
  std::vector<Property> entries_;
};

// ---- The types --------------------------------------------------------------------------------

class StringObject final : public Encapsulated<StringObject, CMPIString, CMPIStringFT> {
 public:
  static constexpr const char* kTableName = "CMPIStringFT";
  static CMPIStringFT* table();
  static StringObject* blank(ObjectScope& scope) { return scope.make<StringObject>(""); }

  // The handle points at the characters, because CMGetCharPtr reads it directly. The pointer
  // to the object is stored just before them, which is how the handle leads back to it.
  StringObject(ObjectScope& scope, std::string_view text);
  std::string_view text() const { return {buffer_.get() + kPrefix, length_}; }
  StringObject* cloneInto(ObjectScope& scope) const { return scope.make<StringObject>(text()); }
  static StringObject* ownerOfHandle(void* handle);

 private:
  // The buffer starts with the owner's address, so that a handle leads back to its object.
  static constexpr std::size_t kPrefix =
      sizeof(StringObject*);  // NOLINT(bugprone-sizeof-expression)
  std::size_t length_;
  std::unique_ptr<char[]> buffer_;
};

class ArrayObject final : public Encapsulated<ArrayObject, CMPIArray, CMPIArrayFT> {
 public:
  static constexpr const char* kTableName = "CMPIArrayFT";
  static CMPIArrayFT* table();
  static ArrayObject* blank(ObjectScope& scope) { return scope.make<ArrayObject>(CMPI_null, 0); }

  /// An array of `size` null elements of `elementType` (CMPI_chars is stored as CMPI_string).
  ArrayObject(ObjectScope& scope, CMPIType elementType, std::size_t size);
  /// An array holding the elements of an array value.
  ArrayObject(ObjectScope& scope, const Value& array);

  CMPIType elementType() const { return elementType_; }
  std::vector<Value>& elements() { return elements_; }
  Value toValue() const { return Value::array(elementType_, elements_); }
  ArrayObject* cloneInto(ObjectScope& scope) const { return scope.make<ArrayObject>(toValue()); }

 private:
  CMPIType elementType_;
  std::vector<Value> elements_;
};

class ObjectPathObject final
    : public Encapsulated<ObjectPathObject, CMPIObjectPath, CMPIObjectPathFT> {
 public:
  static constexpr const char* kTableName = "CMPIObjectPathFT";
  static CMPIObjectPathFT* table();
  static ObjectPathObject* blank(ObjectScope& scope) {
    return scope.make<ObjectPathObject>(ObjectPathValue());
  }

  ObjectPathObject(ObjectScope& scope, ObjectPathValue path);
  ObjectPathValue& path() { return path_; }
  ObjectPathObject* cloneInto(ObjectScope& scope) const {
    return scope.make<ObjectPathObject>(path_);
  }

 private:
  ObjectPathValue path_;
};

class InstanceObject final : public Encapsulated<InstanceObject, CMPIInstance, CMPIInstanceFT> {
 public:
  static constexpr const char* kTableName = "CMPIInstanceFT";
  static CMPIInstanceFT* table();
  static InstanceObject* blank(ObjectScope& scope) {
    return scope.make<InstanceObject>(InstanceValue());
  }

  /// `value.path()` is the path the instance was created with.
  InstanceObject(ObjectScope& scope, InstanceValue value);

  InstanceValue& value() { return value_; }
  /// Null for no filter; otherwise the names setProperty accepts (property list and keys).
  void setFilter(std::optional<std::vector<std::string>> names) { filter_ = std::move(names); }
  bool accepts(std::string_view name) const;

  /// The instance's object path: its namespace, host and class, and as keys the values of the
  /// class's key properties (from the broker's key table) that are set and not null; for a
  /// class without an entry in the table, the keys of the creation path.
  ObjectPathValue computePath() const;
  /// The instance as a value, with computePath() as its path.
  InstanceValue snapshot() const;
  InstanceObject* cloneInto(ObjectScope& scope) const;

 private:
  InstanceValue value_;
  std::optional<std::vector<std::string>> filter_;
};

class EnumerationObject final
    : public Encapsulated<EnumerationObject, CMPIEnumeration, CMPIEnumerationFT> {
 public:
  static constexpr const char* kTableName = "CMPIEnumerationFT";
  static CMPIEnumerationFT* table();
  static EnumerationObject* blank(ObjectScope& scope) {
    return scope.make<EnumerationObject>(CMPI_null, std::vector<Value>());
  }

  /// `itemType` is what toArray() makes an array of (CMPI_ref or CMPI_instance).
  EnumerationObject(ObjectScope& scope, CMPIType itemType, std::vector<Value> items);

  CMPIType itemType() const { return itemType_; }
  const std::vector<Value>& items() const { return items_; }
  std::size_t position() const { return next_; }
  /// The next item, or null at the end.
  const Value* next();
  bool hasNext() const { return next_ < items_.size(); }
  EnumerationObject* cloneInto(ObjectScope& scope) const;

 private:
  CMPIType itemType_;
  std::vector<Value> items_;
  std::size_t next_ = 0;
};

class ResultObject final : public Encapsulated<ResultObject, CMPIResult, CMPIResultFT> {
 public:
  static constexpr const char* kTableName = "CMPIResultFT";
  static CMPIResultFT* table();
  static ResultObject* blank(ObjectScope& scope) { return scope.make<ResultObject>(nullptr); }

  /// Results go to `request` (null: nowhere, for the blank object of a fault).
  ResultObject(ObjectScope& scope, RequestState* request);
  RequestState* request() const { return request_; }
  /// Not pinned, unlike the request's own result: a provider's copy is the provider's to free.
  ResultObject* cloneInto(ObjectScope& scope) const { return scope.make<ResultObject>(request_); }

 private:
  RequestState* request_;
};

class ContextObject final : public Encapsulated<ContextObject, CMPIContext, CMPIContextFT> {
 public:
  static constexpr const char* kTableName = "CMPIContextFT";
  static CMPIContextFT* table();
  static ContextObject* blank(ObjectScope& scope) { return scope.make<ContextObject>(); }

  explicit ContextObject(ObjectScope& scope);
  NamedValues& entries() { return entries_; }
  ContextObject* cloneInto(ObjectScope& scope) const;

 private:
  NamedValues entries_;
};

class ArgsObject final : public Encapsulated<ArgsObject, CMPIArgs, CMPIArgsFT> {
 public:
  static constexpr const char* kTableName = "CMPIArgsFT";
  static CMPIArgsFT* table();
  static ArgsObject* blank(ObjectScope& scope) { return scope.make<ArgsObject>(); }

  explicit ArgsObject(ObjectScope& scope);
  NamedValues& args() { return args_; }
  ArgsObject* cloneInto(ObjectScope& scope) const;

 private:
  NamedValues args_;
};

class DateTimeObject final : public Encapsulated<DateTimeObject, CMPIDateTime, CMPIDateTimeFT> {
 public:
  static constexpr const char* kTableName = "CMPIDateTimeFT";
  static CMPIDateTimeFT* table();
  static DateTimeObject* blank(ObjectScope& scope) {
    return scope.make<DateTimeObject>(CMPIUint64{0}, false);
  }

  /// `micros`: microseconds since 1970-01-01 00:00:00 UTC, or the length of an interval.
  DateTimeObject(ObjectScope& scope, CMPIUint64 micros, bool interval);
  CMPIUint64 micros() const { return micros_; }
  bool interval() const { return interval_; }
  /// The 25-character CIM text.
  std::string text() const;
  DateTimeObject* cloneInto(ObjectScope& scope) const {
    return scope.make<DateTimeObject>(micros_, interval_);
  }

 private:
  CMPIUint64 micros_;
  bool interval_;
};

/// A mark of CMPIBrokerMemFT: what release() frees back to. Not a CMPI type.
class GcMark final : public ManagedObject {
 public:
  GcMark(ObjectScope& scope, std::uint64_t sequence);
  GcMark(const GcMark&) = delete;
  GcMark& operator=(const GcMark&) = delete;
  ~GcMark() override;
  std::uint64_t sequence() const { return sequence_; }

 private:
  std::uint64_t sequence_;
};

}  // namespace cmpihost::detail
