// CMPIObjectPath: namespace, host, class name and keys. Getters hand out new strings and values
// in the current scope; setters copy what they are given.
#include <cmpihost/convert.h>
#include <cmpihost/status.h>

#include "objects.h"
#include "table_support.h"
#include "text.h"
#include "value_bridge.h"

namespace cmpihost::detail {

namespace {

using Args = std::vector<std::string>;
constexpr const char* kTable = ObjectPathObject::kTableName;

CMPIStatus nullArgument(BrokerCore* core, const char* function, const char* what) {
  return failure(core, CMPI_RC_ERR_INVALID_PARAMETER,
                 std::string(kTable) + "." + function + ": " + what + " is NULL");
}

CMPIString* newString(BrokerCore& core, const std::string& text) {
  return core.targetScope().make<StringObject>(text)->cmpi();
}

CMPIStatus pathRelease(CMPIObjectPath* path) { return releaseObject<ObjectPathObject>(path); }

CMPIObjectPath* pathClone(const CMPIObjectPath* path, CMPIStatus* rc) {
  return cloneObject<ObjectPathObject>(path, rc);
}

// The three text setters differ only in the part they set.
template <class Setter>
CMPIStatus setPart(CMPIObjectPath* path, const char* function, const char* text, Setter&& set) {
  const auto call = enter<ObjectPathObject>(path, function,
                                            [&](Args& args) { args.push_back(textOrNull(text)); });
  if (!call.usable()) return invalidHandle(call.core, kTable, function);
  if (text == nullptr) return nullArgument(call.core, function, "the text");
  set(call.self->path(), text);
  return okStatus();
}

template <class Getter>
CMPIString* getPart(const CMPIObjectPath* path, const char* function, CMPIStatus* rc,
                    Getter&& get) {
  const auto call = enter<ObjectPathObject>(path, function);
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, function));
    return nullptr;
  }
  setRc(rc, okStatus());
  return newString(*call.core, get(call.self->path()));
}

CMPIStatus pathSetNameSpace(CMPIObjectPath* path, const char* nameSpace) {
  return setPart(path, "setNameSpace", nameSpace,
                 [](ObjectPathValue& value, const char* text) { value.setNameSpace(text); });
}

CMPIString* pathGetNameSpace(const CMPIObjectPath* path, CMPIStatus* rc) {
  return getPart(path, "getNameSpace", rc,
                 [](const ObjectPathValue& value) { return value.nameSpace(); });
}

CMPIStatus pathSetHostname(CMPIObjectPath* path, const char* host) {
  return setPart(path, "setHostname", host,
                 [](ObjectPathValue& value, const char* text) { value.setHost(text); });
}

CMPIString* pathGetHostname(const CMPIObjectPath* path, CMPIStatus* rc) {
  return getPart(path, "getHostname", rc,
                 [](const ObjectPathValue& value) { return value.host(); });
}

CMPIStatus pathSetClassName(CMPIObjectPath* path, const char* className) {
  return setPart(path, "setClassName", className,
                 [](ObjectPathValue& value, const char* text) { value.setClassName(text); });
}

CMPIString* pathGetClassName(const CMPIObjectPath* path, CMPIStatus* rc) {
  return getPart(path, "getClassName", rc,
                 [](const ObjectPathValue& value) { return value.className(); });
}

CMPIStatus pathAddKey(CMPIObjectPath* path, const char* name, const CMPIValue* value,
                      const CMPIType type) {
  const auto call = enter<ObjectPathObject>(path, "addKey", [&](Args& args) {
    args.push_back(textOrNull(name));
    args.push_back(describeValue(value, type));
    args.push_back(typeName(type));
  });
  if (!call.usable()) return invalidHandle(call.core, kTable, "addKey");
  if (name == nullptr) return nullArgument(call.core, "addKey", "the key name");
  ReadValue read = readValue(value, type);
  if (!read.ok())
    return failure(call.core, read.rc, std::string(kTable) + ".addKey: " + read.error);
  call.self->path().addKey(name, std::move(read.value));
  return okStatus();
}

CMPIData pathGetKey(const CMPIObjectPath* path, const char* name, CMPIStatus* rc) {
  const auto call = enter<ObjectPathObject>(path, "getKey",
                                            [&](Args& args) { args.push_back(textOrNull(name)); });
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getKey"));
    return nullData();
  }
  if (name == nullptr) {
    setRc(rc, nullArgument(call.core, "getKey", "the key name"));
    return nullData();
  }
  const Value* key = call.self->path().findKey(name);
  if (key == nullptr) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NOT_FOUND,
                      std::string(kTable) + ".getKey: no key named " + name));
    return nullData(CMPI_null, CMPI_notFound);
  }
  setRc(rc, okStatus());
  return toData(*key, call.core->targetScope(), CMPI_keyValue);
}

CMPIData pathGetKeyAt(const CMPIObjectPath* path, CMPICount index, CMPIString** name,
                      CMPIStatus* rc) {
  const auto call = enter<ObjectPathObject>(
      path, "getKeyAt", [&](Args& args) { args.push_back(std::to_string(index)); });
  if (name != nullptr) *name = nullptr;
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getKeyAt"));
    return nullData();
  }
  const std::vector<KeyBinding>& keys = call.self->path().keys();
  if (index >= keys.size()) {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NOT_FOUND,
                      std::string(kTable) + ".getKeyAt: index " + std::to_string(index) +
                          " is out of range (" + std::to_string(keys.size()) + " keys)"));
    return nullData(CMPI_null, CMPI_notFound);
  }
  if (name != nullptr) *name = newString(*call.core, keys[index].name);
  setRc(rc, okStatus());
  return toData(keys[index].value, call.core->targetScope(), CMPI_keyValue);
}

CMPICount pathGetKeyCount(const CMPIObjectPath* path, CMPIStatus* rc) {
  const auto call = enter<ObjectPathObject>(path, "getKeyCount");
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, "getKeyCount"));
    return 0;
  }
  setRc(rc, okStatus());
  return static_cast<CMPICount>(call.self->path().keys().size());
}

// Copies namespace (and host) from a path of any broker.
CMPIStatus copyFrom(CMPIObjectPath* path, const CMPIObjectPath* source, const char* function,
                    bool withHost) {
  const auto call = enter<ObjectPathObject>(
      path, function, [&](Args& args) { args.push_back(describeObject(source)); });
  if (!call.usable()) return invalidHandle(call.core, kTable, function);
  if (source == nullptr) return nullArgument(call.core, function, "the source path");
  const std::optional<ObjectPathValue> from = toObjectPathValue(source);
  if (!from) {
    return failure(call.core, CMPI_RC_ERR_INVALID_HANDLE,
                   std::string(kTable) + "." + function + ": the source path has a null handle");
  }
  call.self->path().setNameSpace(from->nameSpace());
  if (withHost) call.self->path().setHost(from->host());
  return okStatus();
}

CMPIStatus pathSetNameSpaceFromObjectPath(CMPIObjectPath* path, const CMPIObjectPath* source) {
  return copyFrom(path, source, "setNameSpaceFromObjectPath", false);
}

CMPIStatus pathSetHostAndNameSpaceFromObjectPath(CMPIObjectPath* path,
                                                 const CMPIObjectPath* source) {
  return copyFrom(path, source, "setHostAndNameSpaceFromObjectPath", true);
}

// The host has no class repository, so there are no qualifiers to report.
CMPIData noQualifiers(const CMPIObjectPath* path, const char* function, CMPIStatus* rc,
                      std::initializer_list<const char*> names) {
  const auto call = enter<ObjectPathObject>(path, function, [&](Args& args) {
    for (const char* name : names) args.push_back(textOrNull(name));
  });
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, kTable, function));
  } else {
    setRc(rc, failure(call.core, CMPI_RC_ERR_NOT_SUPPORTED,
                      std::string(kTable) + "." + function + " is not supported by this broker"));
  }
  return nullData();
}

CMPIData pathGetClassQualifier(const CMPIObjectPath* path, const char* qName, CMPIStatus* rc) {
  return noQualifiers(path, "getClassQualifier", rc, {qName});
}

CMPIData pathGetPropertyQualifier(const CMPIObjectPath* path, const char* pName, const char* qName,
                                  CMPIStatus* rc) {
  return noQualifiers(path, "getPropertyQualifier", rc, {pName, qName});
}

CMPIData pathGetMethodQualifier(const CMPIObjectPath* path, const char* methodName,
                                const char* qName, CMPIStatus* rc) {
  return noQualifiers(path, "getMethodQualifier", rc, {methodName, qName});
}

CMPIData pathGetParameterQualifier(const CMPIObjectPath* path, const char* mName, const char* pName,
                                   const char* qName, CMPIStatus* rc) {
  return noQualifiers(path, "getParameterQualifier", rc, {mName, pName, qName});
}

CMPIString* pathToString(const CMPIObjectPath* path, CMPIStatus* rc) {
  return getPart(path, "toString", rc,
                 [](const ObjectPathValue& value) { return value.toString(); });
}

CMPIObjectPathFT pathTable = {CMPICurrentVersion,
                              pathRelease,
                              pathClone,
                              pathSetNameSpace,
                              pathGetNameSpace,
                              pathSetHostname,
                              pathGetHostname,
                              pathSetClassName,
                              pathGetClassName,
                              pathAddKey,
                              pathGetKey,
                              pathGetKeyAt,
                              pathGetKeyCount,
                              pathSetNameSpaceFromObjectPath,
                              pathSetHostAndNameSpaceFromObjectPath,
                              pathGetClassQualifier,
                              pathGetPropertyQualifier,
                              pathGetMethodQualifier,
                              pathGetParameterQualifier,
                              pathToString};

}  // namespace

CMPIObjectPathFT* ObjectPathObject::table() { return &pathTable; }

ObjectPathObject::ObjectPathObject(ObjectScope& scope, ObjectPathValue path)
    : Encapsulated(scope), path_(std::move(path)) {}

}  // namespace cmpihost::detail
