// CMPIInstance: properties in the order they were first set, a property filter, and the path the
// instance was created with. Its object path is computed from the class's key properties, the
// way an object manager derives an instance name.
#include <cmpihost/convert.h>
#include <cmpihost/status.h>

#include "broker_core.h"
#include "objects.h"
#include "table_support.h"
#include "text.h"
#include "value_bridge.h"

namespace cmpihost::detail {

namespace {

using Args = std::vector<std::string>;
constexpr const char* kTable = InstanceObject::kTableName;

CMPIStatus nullArgument(BrokerCore* core, const char* function, const char* what) {
  return failure(core, CMPI_RC_ERR_INVALID_PARAMETER,
                 std::string(kTable) + "." + function + ": " + what + " is NULL");
}

CMPIStatus instanceRelease(CMPIInstance* instance) {
  return releaseObject<InstanceObject>(instance);
}

CMPIInstance* instanceClone(const CMPIInstance* instance, CMPIStatus* rc) {
  return cloneObject<InstanceObject>(instance, rc);
}

CMPIData instanceGetProperty(const CMPIInstance* instance, const char* name, CMPIStatus* rc) {
  const auto call = enter<InstanceObject>(instance, "getProperty",
                                          [&](Args& args) { args.push_back(textOrNull(name)); });
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getProperty"));
    return nullData();
  }
  if (name == nullptr) {
    setRc(rc, nullArgument(call.core, "getProperty", "the property name"));
    return nullData();
  }
  const Value* value = call.self->value().find(name);
  if (value == nullptr) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NO_SUCH_PROPERTY,
                      std::string(kTable) + ".getProperty: no property named " + name));
    return nullData(CMPI_null, CMPI_notFound);
  }
  setRc(rc, okStatus());
  return toData(*value, call.core->targetScope());
}

CMPIData instanceGetPropertyAt(const CMPIInstance* instance, CMPICount index, CMPIString** name,
                               CMPIStatus* rc) {
  const auto call = enter<InstanceObject>(
      instance, "getPropertyAt", [&](Args& args) { args.push_back(std::to_string(index)); });
  if (name != nullptr) *name = nullptr;
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getPropertyAt"));
    return nullData();
  }
  const std::vector<Property>& properties = call.self->value().properties();
  if (index >= properties.size()) {
    setRc(rc,
          failure(call.core, CMPI_RC_ERR_NO_SUCH_PROPERTY,
                  std::string(kTable) + ".getPropertyAt: index " + std::to_string(index) +
                      " is out of range (" + std::to_string(properties.size()) + " properties)"));
    return nullData(CMPI_null, CMPI_notFound);
  }
  if (name != nullptr) {
    *name = call.core->targetScope().make<StringObject>(properties[index].name)->cmpi();
  }
  setRc(rc, okStatus());
  return toData(properties[index].value, call.core->targetScope());
}

CMPICount instanceGetPropertyCount(const CMPIInstance* instance, CMPIStatus* rc) {
  const auto call = enter<InstanceObject>(instance, "getPropertyCount");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getPropertyCount"));
    return 0;
  }
  setRc(rc, okStatus());
  return static_cast<CMPICount>(call.self->value().propertyCount());
}

// setProperty and setPropertyWithOrigin: the origin is recorded and otherwise ignored.
CMPIStatus setPropertyCommon(const CMPIInstance* instance, const char* function, const char* name,
                             const CMPIValue* value, CMPIType type, const char* const* origin) {
  const auto call = enter<InstanceObject>(instance, function, [&](Args& args) {
    args.push_back(textOrNull(name));
    args.push_back(describeValue(value, type));
    args.push_back(typeName(type));
    if (origin != nullptr) args.push_back(textOrNull(*origin));
  });
  if (!call.usable()) return invalidHandle(call.core, kTable, function);
  if (name == nullptr) return nullArgument(call.core, function, "the property name");
  // A filtered-out property is dropped silently, as object managers do: the provider need not
  // know which properties the client asked for.
  if (!call.self->accepts(name)) return okStatus();
  ReadValue read = readValue(value, type);
  if (!read.ok()) {
    return failure(call.core, read.rc, std::string(kTable) + "." + function + ": " + read.error);
  }
  call.self->value().set(name, std::move(read.value));
  return okStatus();
}

CMPIStatus instanceSetProperty(const CMPIInstance* instance, const char* name,
                               const CMPIValue* value, CMPIType type) {
  return setPropertyCommon(instance, "setProperty", name, value, type, nullptr);
}

CMPIStatus instanceSetPropertyWithOrigin(const CMPIInstance* instance, const char* name,
                                         const CMPIValue* value, const CMPIType type,
                                         const char* origin) {
  return setPropertyCommon(instance, "setPropertyWithOrigin", name, value, type, &origin);
}

CMPIObjectPath* instanceGetObjectPath(const CMPIInstance* instance, CMPIStatus* rc) {
  const auto call = enter<InstanceObject>(instance, "getObjectPath");
  if (call.core != nullptr) {
    const FaultDecision fault = call.core->faults().onCall(CreatingFunction::GetObjectPath);
    if (fault.fire) {
      return faultedResult<ObjectPathObject>(*call.core, fault, call.core->targetScope(), rc);
    }
  }
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getObjectPath"));
    return nullptr;
  }
  setRc(rc, okStatus());
  return call.core->targetScope().make<ObjectPathObject>(call.self->computePath())->cmpi();
}

std::vector<std::string> names(const char** list) {
  std::vector<std::string> out;
  if (list == nullptr) return out;
  for (const char** name = list; *name != nullptr; ++name) out.emplace_back(*name);
  return out;
}

CMPIStatus instanceSetPropertyFilter(CMPIInstance* instance, const char** propertyList,
                                     const char** keys) {
  const auto call = enter<InstanceObject>(instance, "setPropertyFilter", [&](Args& args) {
    args.push_back(describeList(propertyList));
    args.push_back(describeList(keys));
  });
  if (!call.usable()) return invalidHandle(call.core, kTable, "setPropertyFilter");
  if (propertyList == nullptr) {
    // A null list asks for every property.
    call.self->setFilter(std::nullopt);
    return okStatus();
  }
  std::vector<std::string> accepted = names(propertyList);
  for (std::string& key : names(keys)) accepted.push_back(std::move(key));
  call.self->setFilter(std::move(accepted));
  return okStatus();
}

CMPIStatus instanceSetObjectPath(CMPIInstance* instance, const CMPIObjectPath* path) {
  const auto call = enter<InstanceObject>(
      instance, "setObjectPath", [&](Args& args) { args.push_back(describeObject(path)); });
  if (!call.usable()) return invalidHandle(call.core, kTable, "setObjectPath");
  if (path == nullptr) return nullArgument(call.core, "setObjectPath", "the object path");
  std::optional<ObjectPathValue> value = toObjectPathValue(path);
  if (!value) {
    return failure(call.core, CMPI_RC_ERR_INVALID_HANDLE,
                   std::string(kTable) + ".setObjectPath: the object path has a null handle");
  }
  call.self->value().setPath(std::move(*value));
  return okStatus();
}

CMPIInstanceFT instanceTable = {CMPICurrentVersion,
                                instanceRelease,
                                instanceClone,
                                instanceGetProperty,
                                instanceGetPropertyAt,
                                instanceGetPropertyCount,
                                instanceSetProperty,
                                instanceGetObjectPath,
                                instanceSetPropertyFilter,
                                instanceSetObjectPath,
                                instanceSetPropertyWithOrigin};

}  // namespace

CMPIInstanceFT* InstanceObject::table() { return &instanceTable; }

InstanceObject::InstanceObject(ObjectScope& scope, InstanceValue value)
    : Encapsulated(scope), value_(std::move(value)) {}

bool InstanceObject::accepts(std::string_view name) const {
  if (!filter_) return true;
  for (const std::string& accepted : *filter_) {
    if (equalsIgnoringCase(accepted, name)) return true;
  }
  return false;
}

ObjectPathValue InstanceObject::computePath() const {
  const ObjectPathValue& created = value_.path();
  const std::optional<std::vector<std::string>> keyNames = core().classKeys(created.className());
  if (!keyNames) return created;
  ObjectPathValue path(created.nameSpace(), created.className());
  path.setHost(created.host());
  for (const std::string& keyName : *keyNames) {
    const Value* value = value_.find(keyName);
    if (value != nullptr && !value->isNull()) path.addKey(keyName, *value);
  }
  return path;
}

InstanceValue InstanceObject::snapshot() const {
  InstanceValue copy = value_;
  copy.setPath(computePath());
  return copy;
}

InstanceObject* InstanceObject::cloneInto(ObjectScope& scope) const {
  InstanceObject* copy = scope.make<InstanceObject>(value_);
  copy->filter_ = filter_;
  return copy;
}

}  // namespace cmpihost::detail
