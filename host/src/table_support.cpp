#include "table_support.h"

#include <cmpihost/status.h>

#include "objects.h"
#include "text.h"
#include "value_bridge.h"

namespace cmpihost::detail {

CMPIStatus failure(BrokerCore* core, CMPIrc rc, const std::string& message) {
  if (core == nullptr) return CMPIStatus{rc, nullptr};
  return core->makeStatus(rc, message);
}

CMPIStatus invalidHandle(BrokerCore* core, const char* table, const char* function) {
  return failure(
      core, CMPI_RC_ERR_INVALID_HANDLE,
      std::string(table) + "." + function + ": the object is NULL or its handle is null");
}

namespace {

// Every encapsulated struct starts with {hdl, ft}; the table pointer tells the types apart.
struct AnyObject {
  void* hdl;
  const void* ft;
};

template <class Self>
bool isA(const AnyObject* object) {
  return object->ft == static_cast<const void*>(Self::table());
}

// What a pointer with one of our tables is, when it is not an object of ours: a faulted object
// (null handle) or a copy of one's struct.
std::string unusable(const AnyObject* object, const char* type) {
  return std::string("<") + type +
         (object->hdl == nullptr ? " with null handle>" : " that is not the broker's object>");
}

}  // namespace

std::string describeObject(const void* object) {
  if (object == nullptr) return "NULL";
  const auto* any = static_cast<const AnyObject*>(object);
  if (isA<StringObject>(any)) {
    const StringObject* self = StringObject::from(static_cast<const CMPIString*>(object));
    return self != nullptr ? quoted(self->text()) : unusable(any, "CMPIString");
  }
  if (isA<ObjectPathObject>(any)) {
    ObjectPathObject* self = ObjectPathObject::from(static_cast<const CMPIObjectPath*>(object));
    return self != nullptr ? self->path().toString() : unusable(any, "CMPIObjectPath");
  }
  if (isA<InstanceObject>(any)) {
    InstanceObject* self = InstanceObject::from(static_cast<const CMPIInstance*>(object));
    return self != nullptr ? "instance of " + self->value().className()
                           : unusable(any, "CMPIInstance");
  }
  if (isA<ArrayObject>(any)) {
    ArrayObject* self = ArrayObject::from(static_cast<const CMPIArray*>(object));
    if (self == nullptr) return unusable(any, "CMPIArray");
    return "array of " + typeName(self->elementType()) + "[" +
           std::to_string(self->elements().size()) + "]";
  }
  if (isA<EnumerationObject>(any)) {
    const EnumerationObject* self =
        EnumerationObject::from(static_cast<const CMPIEnumeration*>(object));
    if (self == nullptr) return unusable(any, "CMPIEnumeration");
    return "enumeration(" + std::to_string(self->items().size()) + ")";
  }
  if (isA<ContextObject>(any)) {
    return ContextObject::from(static_cast<const CMPIContext*>(object)) != nullptr
               ? "context"
               : unusable(any, "CMPIContext");
  }
  if (isA<ResultObject>(any)) {
    return ResultObject::from(static_cast<const CMPIResult*>(object)) != nullptr
               ? "result"
               : unusable(any, "CMPIResult");
  }
  if (isA<ArgsObject>(any)) {
    ArgsObject* self = ArgsObject::from(static_cast<const CMPIArgs*>(object));
    if (self == nullptr) return unusable(any, "CMPIArgs");
    return "args(" + std::to_string(self->args().size()) + ")";
  }
  if (isA<DateTimeObject>(any)) {
    const DateTimeObject* self = DateTimeObject::from(static_cast<const CMPIDateTime*>(object));
    return self != nullptr ? self->text() : unusable(any, "CMPIDateTime");
  }
  return "<foreign object>";
}

std::string describeList(const char** list) {
  if (list == nullptr) return "NULL";
  std::string text = "{";
  for (const char** name = list; *name != nullptr; ++name) {
    if (name != list) text += ", ";
    text += *name;
  }
  return text + "}";
}

std::string describeValue(const CMPIValue* value, CMPIType type) {
  const ReadValue read = readValue(value, type);
  if (!read.ok()) return "<unreadable " + typeName(type) + ": " + read.error + ">";
  return read.value.toString();
}

}  // namespace cmpihost::detail
