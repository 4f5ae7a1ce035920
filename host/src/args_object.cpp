// CMPIArgs: named method arguments. The host runs no methods, but providers may still build
// argument lists, so the type works in full.
#include <cmpihost/status.h>

#include "objects.h"
#include "table_support.h"
#include "text.h"
#include "value_bridge.h"

namespace cmpihost::detail {

namespace {

using Args = std::vector<std::string>;
constexpr const char* kTable = ArgsObject::kTableName;

CMPIStatus argsRelease(CMPIArgs* args) { return releaseObject<ArgsObject>(args); }

CMPIArgs* argsClone(const CMPIArgs* args, CMPIStatus* rc) {
  return cloneObject<ArgsObject>(args, rc);
}

CMPIStatus argsAddArg(const CMPIArgs* object, const char* name, const CMPIValue* value,
                      const CMPIType type) {
  const auto call = enter<ArgsObject>(object, "addArg", [&](Args& args) {
    args.push_back(textOrNull(name));
    args.push_back(describeValue(value, type));
    args.push_back(typeName(type));
  });
  if (!call.usable()) return invalidHandle(call.core, kTable, "addArg");
  if (name == nullptr) {
    return failure(call.core, CMPI_RC_ERR_INVALID_PARAMETER,
                   std::string(kTable) + ".addArg: the argument name is NULL");
  }
  ReadValue read = readValue(value, type);
  if (!read.ok())
    return failure(call.core, read.rc, std::string(kTable) + ".addArg: " + read.error);
  call.self->args().set(name, std::move(read.value));
  return okStatus();
}

CMPIData argsGetArg(const CMPIArgs* object, const char* name, CMPIStatus* rc) {
  const auto call =
      enter<ArgsObject>(object, "getArg", [&](Args& args) { args.push_back(textOrNull(name)); });
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getArg"));
    return nullData();
  }
  if (name == nullptr) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_INVALID_PARAMETER,
                      std::string(kTable) + ".getArg: the argument name is NULL"));
    return nullData();
  }
  const Value* value = call.self->args().find(name);
  if (value == nullptr) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NOT_FOUND,
                      std::string(kTable) + ".getArg: no argument named " + name));
    return nullData(CMPI_null, CMPI_notFound);
  }
  setRc(rc, okStatus());
  return toData(*value, call.core->targetScope());
}

CMPIData argsGetArgAt(const CMPIArgs* object, CMPICount index, CMPIString** name, CMPIStatus* rc) {
  const auto call = enter<ArgsObject>(object, "getArgAt",
                                      [&](Args& args) { args.push_back(std::to_string(index)); });
  if (name != nullptr) *name = nullptr;
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getArgAt"));
    return nullData();
  }
  NamedValues& values = call.self->args();
  if (index >= values.size()) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NOT_FOUND,
                      std::string(kTable) + ".getArgAt: index " + std::to_string(index) +
                          " is out of range"));
    return nullData(CMPI_null, CMPI_notFound);
  }
  if (name != nullptr) {
    *name = call.core->targetScope().make<StringObject>(values.at(index).name)->cmpi();
  }
  setRc(rc, okStatus());
  return toData(values.at(index).value, call.core->targetScope());
}

CMPICount argsGetArgCount(const CMPIArgs* object, CMPIStatus* rc) {
  const auto call = enter<ArgsObject>(object, "getArgCount");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getArgCount"));
    return 0;
  }
  setRc(rc, okStatus());
  return static_cast<CMPICount>(call.self->args().size());
}

CMPIArgsFT argsTable = {CMPICurrentVersion, argsRelease,  argsClone,      argsAddArg,
                        argsGetArg,         argsGetArgAt, argsGetArgCount};

}  // namespace

CMPIArgsFT* ArgsObject::table() { return &argsTable; }

ArgsObject::ArgsObject(ObjectScope& scope) : Encapsulated(scope) {}

ArgsObject* ArgsObject::cloneInto(ObjectScope& scope) const {
  ArgsObject* copy = scope.make<ArgsObject>();
  copy->args_ = args_;
  return copy;
}

}  // namespace cmpihost::detail
