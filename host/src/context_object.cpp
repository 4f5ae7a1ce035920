// CMPIContext: named entries of an operation (invocation flags, namespace, principal ...), and
// the NamedValues list that contexts and method arguments share.
#include <cmpihost/status.h>

#include "objects.h"
#include "table_support.h"
#include "text.h"
#include "value_bridge.h"

namespace cmpihost::detail {

void NamedValues::set(std::string name, Value value) {
  for (Property& entry : entries_) {
    if (equalsIgnoringCase(entry.name, name)) {
      entry.value = std::move(value);
      return;
    }
  }
  entries_.push_back(Property{std::move(name), std::move(value)});
}

const Value* NamedValues::find(std::string_view name) const {
  for (const Property& entry : entries_) {
    if (equalsIgnoringCase(entry.name, name)) return &entry.value;
  }
  return nullptr;
}

namespace {

using Args = std::vector<std::string>;
constexpr const char* kTable = ContextObject::kTableName;

CMPIStatus contextRelease(CMPIContext* context) { return releaseObject<ContextObject>(context); }

CMPIContext* contextClone(const CMPIContext* context, CMPIStatus* rc) {
  return cloneObject<ContextObject>(context, rc);
}

CMPIData contextGetEntry(const CMPIContext* context, const char* name, CMPIStatus* rc) {
  const auto call = enter<ContextObject>(context, "getEntry",
                                         [&](Args& args) { args.push_back(textOrNull(name)); });
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getEntry"));
    return nullData();
  }
  if (name == nullptr) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_INVALID_PARAMETER,
                      std::string(kTable) + ".getEntry: the entry name is NULL"));
    return nullData();
  }
  const Value* value = call.self->entries().find(name);
  if (value == nullptr) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NO_SUCH_PROPERTY,
                      std::string(kTable) + ".getEntry: no entry named " + name));
    return nullData(CMPI_null, CMPI_notFound);
  }
  setRc(rc, okStatus());
  return toData(*value, call.core->targetScope());
}

CMPIData contextGetEntryAt(const CMPIContext* context, CMPICount index, CMPIString** name,
                           CMPIStatus* rc) {
  const auto call = enter<ContextObject>(
      context, "getEntryAt", [&](Args& args) { args.push_back(std::to_string(index)); });
  if (name != nullptr) *name = nullptr;
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getEntryAt"));
    return nullData();
  }
  NamedValues& entries = call.self->entries();
  if (index >= entries.size()) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NO_SUCH_PROPERTY,
                      std::string(kTable) + ".getEntryAt: index " + std::to_string(index) +
                          " is out of range"));
    return nullData(CMPI_null, CMPI_notFound);
  }
  if (name != nullptr) {
    *name = call.core->targetScope().make<StringObject>(entries.at(index).name)->cmpi();
  }
  setRc(rc, okStatus());
  return toData(entries.at(index).value, call.core->targetScope());
}

CMPICount contextGetEntryCount(const CMPIContext* context, CMPIStatus* rc) {
  const auto call = enter<ContextObject>(context, "getEntryCount");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getEntryCount"));
    return 0;
  }
  setRc(rc, okStatus());
  return static_cast<CMPICount>(call.self->entries().size());
}

CMPIStatus contextAddEntry(const CMPIContext* context, const char* name, const CMPIValue* value,
                           const CMPIType type) {
  const auto call = enter<ContextObject>(context, "addEntry", [&](Args& args) {
    args.push_back(textOrNull(name));
    args.push_back(describeValue(value, type));
    args.push_back(typeName(type));
  });
  if (!call.usable()) return invalidHandle(call.core, kTable, "addEntry");
  if (name == nullptr) {
    return failure(call.core, CMPI_RC_ERR_INVALID_PARAMETER,
                   std::string(kTable) + ".addEntry: the entry name is NULL");
  }
  ReadValue read = readValue(value, type);
  if (!read.ok())
    return failure(call.core, read.rc, std::string(kTable) + ".addEntry: " + read.error);
  call.self->entries().set(name, std::move(read.value));
  return okStatus();
}

CMPIContextFT contextTable = {CMPICurrentVersion, contextRelease,    contextClone,
                              contextGetEntry,    contextGetEntryAt, contextGetEntryCount,
                              contextAddEntry};

}  // namespace

CMPIContextFT* ContextObject::table() { return &contextTable; }

ContextObject::ContextObject(ObjectScope& scope) : Encapsulated(scope) {}

ContextObject* ContextObject::cloneInto(ObjectScope& scope) const {
  ContextObject* copy = scope.make<ContextObject>();
  copy->entries_ = entries_;
  return copy;
}

}  // namespace cmpihost::detail
