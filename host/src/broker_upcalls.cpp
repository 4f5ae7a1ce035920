// CMPIBrokerFT: the up-calls. Only the two enumerations are answered (from what the test
// configured); the host does not route operations to other providers, so every other up-call
// reports CMPI_RC_ERR_NOT_SUPPORTED.
#include <cmpihost/convert.h>
#include <cmpihost/status.h>

#include "broker_core.h"
#include "objects.h"
#include "table_support.h"
#include "text.h"

namespace cmpihost::detail {

namespace {

using Args = std::vector<std::string>;
constexpr const char* kTable = "CMPIBrokerFT";

CMPIStatus notSupported(BrokerCore* core, const char* function) {
  if (core == nullptr) return invalidBroker();
  return failure(core, CMPI_RC_ERR_NOT_SUPPORTED,
                 std::string(kTable) + "." + function + " is not supported by this broker");
}

CMPIContext* upPrepareAttachThread(const CMPIBroker* broker, const CMPIContext* context) {
  BrokerCore* core = enterBroker(broker, kTable, "prepareAttachThread",
                                 [&](Args& args) { args.push_back(describeObject(context)); });
  if (core == nullptr) return nullptr;
  // The new thread may outlive the request, so its context belongs to the broker itself.
  ObjectScope& scope = core->rootScope();
  ContextObject* source = ContextObject::from(context);
  ContextObject* copy = source != nullptr && source->hasHandle() ? source->cloneInto(scope)
                                                                 : ContextObject::blank(scope);
  return copy->cmpi();
}

CMPIStatus upAttachThread(const CMPIBroker* broker, const CMPIContext* context) {
  BrokerCore* core = enterBroker(broker, kTable, "attachThread",
                                 [&](Args& args) { args.push_back(describeObject(context)); });
  return core != nullptr ? okStatus() : invalidBroker();
}

CMPIStatus upDetachThread(const CMPIBroker* broker, const CMPIContext* context) {
  BrokerCore* core = enterBroker(broker, kTable, "detachThread",
                                 [&](Args& args) { args.push_back(describeObject(context)); });
  if (core == nullptr) return invalidBroker();
  // Detaching frees the context that prepareAttachThread made.
  if (ContextObject* object = ContextObject::from(context)) object->scope().destroy(object);
  return okStatus();
}

CMPIStatus upDeliverIndication(const CMPIBroker* broker, const CMPIContext* context,
                               const char* nameSpace, const CMPIInstance* indication) {
  BrokerCore* core = enterBroker(broker, kTable, "deliverIndication", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(textOrNull(nameSpace));
    args.push_back(describeObject(indication));
  });
  return notSupported(core, "deliverIndication");
}

bool isListed(const char** names, const std::string& name) {
  for (const char** listed = names; *listed != nullptr; ++listed) {
    if (equalsIgnoringCase(*listed, name)) return true;
  }
  return false;
}

bool isKeyName(const std::optional<std::vector<std::string>>& keyNames, const std::string& name) {
  if (!keyNames) return false;
  for (const std::string& key : *keyNames) {
    if (equalsIgnoringCase(key, name)) return true;
  }
  return false;
}

// Both enumeration up-calls: the configured instances of the path's class (or the configured
// failure), as names or as instances.
CMPIEnumeration* enumerate(const CMPIBroker* broker, const CMPIContext* context,
                           const CMPIObjectPath* path, const char** properties, bool namesOnly,
                           CMPIStatus* rc) {
  const char* function = namesOnly ? "enumerateInstanceNames" : "enumerateInstances";
  BrokerCore* core = enterBroker(broker, kTable, function, [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    if (!namesOnly) args.push_back(describeList(properties));
  });
  if (core == nullptr) {
    setRc(rc, invalidBroker());
    return nullptr;
  }
  const FaultDecision fault = core->faults().onCall(
      namesOnly ? CreatingFunction::EnumerateInstanceNames : CreatingFunction::EnumerateInstances);
  if (fault.fire) return faultedResult<EnumerationObject>(*core, fault, core->targetScope(), rc);

  if (path == nullptr) {
    setRc(rc, failure(core, CMPI_RC_ERR_INVALID_PARAMETER,
                      std::string(kTable) + "." + function + ": the object path is NULL"));
    return nullptr;
  }
  const std::optional<ObjectPathValue> classPath = toObjectPathValue(path);
  if (!classPath) {
    setRc(rc,
          failure(core, CMPI_RC_ERR_INVALID_HANDLE,
                  std::string(kTable) + "." + function + ": the object path has a null handle"));
    return nullptr;
  }
  UpcallAnswer answer = core->upcallAnswer(classPath->className());
  if (answer.fail) {
    setRc(rc, core->makeStatus(answer.status));
    return nullptr;
  }
  const std::optional<std::vector<std::string>> keyNames = core->classKeys(classPath->className());
  std::vector<Value> items;
  items.reserve(answer.instances.size());
  for (InstanceValue& instance : answer.instances) {
    ObjectPathValue& instancePath = instance.path();
    if (instancePath.nameSpace().empty()) instancePath.setNameSpace(classPath->nameSpace());
    if (instancePath.className().empty()) instancePath.setClassName(classPath->className());
    // An instance configured without keys gets them from its key properties, as its name would
    // be derived in an object manager.
    if (instancePath.keys().empty() && keyNames) {
      for (const std::string& keyName : *keyNames) {
        const Value* value = instance.find(keyName);
        if (value != nullptr && !value->isNull()) instancePath.addKey(keyName, *value);
      }
    }
    if (namesOnly) {
      items.emplace_back(instancePath);
      continue;
    }
    if (properties != nullptr) {
      // Like a provider's setPropertyFilter with the class's keys: the listed properties and the
      // key properties, so that the instance keeps its name.
      InstanceValue filtered(instancePath);
      for (const Property& property : instance.properties()) {
        if (isListed(properties, property.name) || isKeyName(keyNames, property.name)) {
          filtered.set(property.name, property.value);
        }
      }
      instance = std::move(filtered);
    }
    items.emplace_back(std::move(instance));
  }
  EnumerationObject* enumeration = core->targetScope().make<EnumerationObject>(
      namesOnly ? CMPIType{CMPI_ref} : CMPIType{CMPI_instance}, std::move(items));
  setRc(rc, okStatus());
  return enumeration->cmpi();
}

CMPIEnumeration* upEnumerateInstanceNames(const CMPIBroker* broker, const CMPIContext* context,
                                          const CMPIObjectPath* path, CMPIStatus* rc) {
  return enumerate(broker, context, path, nullptr, true, rc);
}

CMPIEnumeration* upEnumerateInstances(const CMPIBroker* broker, const CMPIContext* context,
                                      const CMPIObjectPath* path, const char** properties,
                                      CMPIStatus* rc) {
  return enumerate(broker, context, path, properties, false, rc);
}

CMPIInstance* upGetInstance(const CMPIBroker* broker, const CMPIContext* context,
                            const CMPIObjectPath* path, const char** properties, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "getInstance", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(describeList(properties));
  });
  setRc(rc, notSupported(core, "getInstance"));
  return nullptr;
}

CMPIObjectPath* upCreateInstance(const CMPIBroker* broker, const CMPIContext* context,
                                 const CMPIObjectPath* path, const CMPIInstance* instance,
                                 CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "createInstance", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(describeObject(instance));
  });
  setRc(rc, notSupported(core, "createInstance"));
  return nullptr;
}

CMPIStatus upModifyInstance(const CMPIBroker* broker, const CMPIContext* context,
                            const CMPIObjectPath* path, const CMPIInstance* instance,
                            const char** properties) {
  BrokerCore* core = enterBroker(broker, kTable, "modifyInstance", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(describeObject(instance));
    args.push_back(describeList(properties));
  });
  return notSupported(core, "modifyInstance");
}

CMPIStatus upDeleteInstance(const CMPIBroker* broker, const CMPIContext* context,
                            const CMPIObjectPath* path) {
  BrokerCore* core = enterBroker(broker, kTable, "deleteInstance", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
  });
  return notSupported(core, "deleteInstance");
}

CMPIEnumeration* upExecQuery(const CMPIBroker* broker, const CMPIContext* context,
                             const CMPIObjectPath* path, const char* query, const char* language,
                             CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "execQuery", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(textOrNull(query));
    args.push_back(textOrNull(language));
  });
  setRc(rc, notSupported(core, "execQuery"));
  return nullptr;
}

CMPIEnumeration* upAssociators(const CMPIBroker* broker, const CMPIContext* context,
                               const CMPIObjectPath* path, const char* assocClass,
                               const char* resultClass, const char* role, const char* resultRole,
                               const char** properties, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "associators", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(textOrNull(assocClass));
    args.push_back(textOrNull(resultClass));
    args.push_back(textOrNull(role));
    args.push_back(textOrNull(resultRole));
    args.push_back(describeList(properties));
  });
  setRc(rc, notSupported(core, "associators"));
  return nullptr;
}

CMPIEnumeration* upAssociatorNames(const CMPIBroker* broker, const CMPIContext* context,
                                   const CMPIObjectPath* path, const char* assocClass,
                                   const char* resultClass, const char* role,
                                   const char* resultRole, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "associatorNames", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(textOrNull(assocClass));
    args.push_back(textOrNull(resultClass));
    args.push_back(textOrNull(role));
    args.push_back(textOrNull(resultRole));
  });
  setRc(rc, notSupported(core, "associatorNames"));
  return nullptr;
}

CMPIEnumeration* upReferences(const CMPIBroker* broker, const CMPIContext* context,
                              const CMPIObjectPath* path, const char* resultClass, const char* role,
                              const char** properties, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "references", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(textOrNull(resultClass));
    args.push_back(textOrNull(role));
    args.push_back(describeList(properties));
  });
  setRc(rc, notSupported(core, "references"));
  return nullptr;
}

CMPIEnumeration* upReferenceNames(const CMPIBroker* broker, const CMPIContext* context,
                                  const CMPIObjectPath* path, const char* resultClass,
                                  const char* role, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "referenceNames", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(textOrNull(resultClass));
    args.push_back(textOrNull(role));
  });
  setRc(rc, notSupported(core, "referenceNames"));
  return nullptr;
}

CMPIData upInvokeMethod(const CMPIBroker* broker, const CMPIContext* context,
                        const CMPIObjectPath* path, const char* method, const CMPIArgs* in,
                        CMPIArgs* out, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "invokeMethod", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(textOrNull(method));
    args.push_back(describeObject(in));
    args.push_back(describeObject(out));
  });
  setRc(rc, notSupported(core, "invokeMethod"));
  return nullData();
}

CMPIStatus upSetProperty(const CMPIBroker* broker, const CMPIContext* context,
                         const CMPIObjectPath* path, const char* name, const CMPIValue* value,
                         CMPIType type) {
  BrokerCore* core = enterBroker(broker, kTable, "setProperty", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(textOrNull(name));
    args.push_back(describeValue(value, type));
    args.push_back(typeName(type));
  });
  return notSupported(core, "setProperty");
}

CMPIData upGetProperty(const CMPIBroker* broker, const CMPIContext* context,
                       const CMPIObjectPath* path, const char* name, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "getProperty", [&](Args& args) {
    args.push_back(describeObject(context));
    args.push_back(describeObject(path));
    args.push_back(textOrNull(name));
  });
  setRc(rc, notSupported(core, "getProperty"));
  return nullData();
}

}  // namespace

CMPIBrokerFT makeUpcallTable(const BrokerOptions& options) {
  CMPIBrokerFT table = {options.capabilities, static_cast<unsigned int>(options.version),
                        options.name.c_str(), upPrepareAttachThread,
                        upAttachThread,       upDetachThread,
                        upDeliverIndication,  upEnumerateInstanceNames,
                        upGetInstance,        upCreateInstance,
                        upModifyInstance,     upDeleteInstance,
                        upExecQuery,          upEnumerateInstances,
                        upAssociators,        upAssociatorNames,
                        upReferences,         upReferenceNames,
                        upInvokeMethod,       upSetProperty,
                        upGetProperty};
  return table;
}

}  // namespace cmpihost::detail
