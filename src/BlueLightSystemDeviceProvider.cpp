// The provider of KESTA_BlueLightSystemDevice, the association of every computer system that the
// object manager knows (GroupComponent) with every blue light (PartComponent). The computer
// systems come from another provider, through the broker's up-calls.
#include <atomic>
#include <cstring>
#include <string>
#include <vector>

#include "BlueLightNames.h"
#include "BlueLightObjFactory.h"
#include "KestaCommon.h"
#include "KestaTrace.h"
#include "ProviderFrame.h"
#include "text/Text.h"

namespace Kesta {
namespace BlueLightProvider {

// Logger category of this unit.
static const std::string loggerBlueLightSystemDeviceProvider(
    "Varnel.BlueLightSystemDeviceProvider");

namespace {

constexpr const char* kSourceFile = "BlueLightSystemDeviceProvider.cpp";

// The broker handed to the MI factory functions (instance and association share it); null until
// one of them has run. Operations read it once.
std::atomic<const CMPIBroker*> broker{nullptr};

const char* const kUpcallFailed = "Call to CBEnumInstances of target Class Failed.";

// True when the enumeration has another element; a missing enumeration has none.
bool hasNext(const CMPIEnumeration* enumeration, CMPIStatus* status) {
  return !CMIsNullObject(enumeration) && CMHasNext(enumeration, status) != 0;
}

// The class name of a target path, read straight from the string's handle.
const char* classNameOf(const CMPIObjectPath* path, CMPIStatus* status) {
  CMPIString* name = CMGetClassName(path, status);
  return name != nullptr ? CMGetCharPtr(name) : nullptr;
}

bool sameClass(const char* className, const char* expected) {
  return className != nullptr && std::strcmp(className, expected) == 0;
}

// Whether the source of an association walk is one of the two ends, by its class alone. Only
// asked when no association class came and no far end was found, so that a request naming this
// association meets no additional broker call.
bool startsThisAssociation(const CMPIObjectPath* source) {
  if (!isUsable(source)) return false;
  const char* className = classNameOf(source, nullptr);
  return sameClass(className, ComputerSystemClass) || sameClass(className, BlueLightClass);
}

// Whether a result class named by the client admits the target class: either of two names, in
// any letter case (CIM names are ASCII, so the folding is ASCII's whatever the locale). A null
// result class admits everything.
bool acceptsResultClass(const char* resultClass, const char* servedName, const char* schemaName) {
  return resultClass == nullptr || platform::equalsIgnoringCase(resultClass, servedName) ||
         platform::equalsIgnoringCase(resultClass, schemaName);
}

}  // namespace

// One association instance for every (computer system, light) pair, in the namespace of `ref`.
// 0 on success; 1 on failure, reported to the broker's trace and the log only.
int bluelightSystemDeviceCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                       const CMPIContext* ctx,
                                       std::vector<CMPIInstance*>& instances) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " ref=" << ref << " properties=" << properties << " ctx=" << ctx
         << " instances=" << &instances;
  };
  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus localStatus = okStatus();
  const CMPIBroker* const mb = broker.load();
  const char* const component = BlueLightSystemDeviceProvider;
  const char* keyList[] = {"GroupComponent", "PartComponent", nullptr};

  BlueLightFactory factory(true, false);
  CMPIObjectPath* csClassPath =
      CMNewObjectPath(mb, nameSpaceCharsOf(ref, &localStatus), ComputerSystemClass, &localStatus);
  if (CMIsNullObject(csClassPath)) {
    reportFailure(mb, component, &localStatus, "Create CMPIObjectPath            failed.",
                  "Create CMPIObjectPath failed for             ComputerSystemClass.");
    return 1;
  }
  CMPIEnumeration* systems = CBEnumInstanceNames(mb, ctx, csClassPath, &localStatus);
  if (localStatus.rc != CMPI_RC_OK) {
    KESTA_TRACE(loggerBlueLightSystemDeviceProvider, kFailureTraceLevel, MESSAGE, kUpcallFailed);
    return 1;
  }

  while (hasNext(systems, &localStatus)) {
    CMPIData systemEntry = CMGetNext(systems, &localStatus);
    // Only references name computer systems; anything else the broker might yield is passed by.
    if (systemEntry.type != CMPI_ref || CMIsNullObject(systemEntry.value.ref)) continue;

    std::vector<CMPIObjectPath*> lightPaths;
    lightPaths.reserve(factory.getNumberOfInstances());
    if (factory.getAllBlueLightCMPIObjPaths(mb, ref, lightPaths, &localStatus) != 0) return 1;

    const auto lightCount = static_cast<unsigned short>(lightPaths.size());
    for (unsigned short i = 0; i < lightCount; ++i) {
      CMPIObjectPath* lightPath = lightPaths.at(i);
      if (CMIsNullObject(lightPath)) {
        const char* const text = "CMPIObjectPath is NULL for BlueLight Provider";
        reportFailure(mb, component, &localStatus, text, text);
        return 1;
      }
      CMSetNameSpace(lightPath, nameSpaceCharsOf(ref, &localStatus));
      CMPIObjectPath* assocPath = CMNewObjectPath(mb, nameSpaceCharsOf(ref, &localStatus),
                                                  BlueLightSystemDeviceClass, &localStatus);
      if (CMIsNullObject(assocPath)) {
        // Reported, and the enumeration goes on; a pair without a path cannot be built, so this
        // light gets no instance for this computer system.
        reportFailure(mb, component, &localStatus,
                      "Create CMPIObjectPath failed for HostedAccessPoint",
                      "Create CMPIObjectPath failed for                     HostedAccessPoint.");
        continue;
      }
      CMSetNameSpace(assocPath, nameSpaceCharsOf(ref, &localStatus));
      CMSetHostname(assocPath, Kesta::getSystemName().c_str());
      CMPIInstance* instance = CMNewInstance(mb, assocPath, nullptr);
      if (!CMIsNullObject(instance)) {
        CMSetPropertyFilter(instance, properties, keyList);
        CMSetProperty(instance, "GroupComponent", &systemEntry.value, CMPI_ref);
        CMSetProperty(instance, "PartComponent", &lightPath, CMPI_ref);
      }
      instances.push_back(instance);
    }
  }

  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, EXITING, parameters);
  return 0;
}

CMPIStatus BlueLightSystemDevice_Cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
  return okStatus();
}

CMPIStatus BlueLightSystemDevice_AssociationCleanup(CMPIAssociationMI*, const CMPIContext*,
                                                    CMPIBoolean) {
  return okStatus();
}

CMPIStatus BlueLightSystemDevice_EnumInstanceNames(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                                   const CMPIResult* result,
                                                   const CMPIObjectPath* ref) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " ref=" << ref;
  };
  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();
  const char* const component = BlueLightSystemDeviceProvider;

  BlueLightFactory factory(true, false);
  CMPIObjectPath* csClassPath =
      CMNewObjectPath(mb, nameSpaceCharsOf(ref, &status), ComputerSystemClass, &status);
  if (CMIsNullObject(csClassPath)) {
    reportFailure(mb, component, &status, "Create CMPIObjectPath failed.",
                  "Create CMPIObjectPath failed for ComputerSystemClass.");
    return status;
  }
  CMPIEnumeration* systems = CBEnumInstanceNames(mb, ctx, csClassPath, &status);
  if (status.rc != CMPI_RC_OK) {
    KESTA_TRACE(loggerBlueLightSystemDeviceProvider, kFailureTraceLevel, MESSAGE, kUpcallFailed);
    return status;
  }

  // One vector for all computer systems: the factory appends to it, so the k-th computer system
  // is paired with the lights k times over. Kept as the operation has always answered.
  std::vector<CMPIObjectPath*> lightPaths;
  lightPaths.reserve(factory.getNumberOfInstances());
  while (hasNext(systems, &status)) {
    CMPIData systemEntry = CMGetNext(systems, &status);
    if (systemEntry.type != CMPI_ref || CMIsNullObject(systemEntry.value.ref)) continue;
    if (factory.getAllBlueLightCMPIObjPaths(mb, ref, lightPaths, &status) != 0) return status;

    const auto lightCount = static_cast<unsigned short>(lightPaths.size());
    for (unsigned short i = 0; i < lightCount; ++i) {
      CMPIObjectPath* lightPath = lightPaths.at(i);
      if (CMIsNullObject(lightPath)) {
        reportFailure(mb, component, &status, "CMPIObjectPath is NULL for BlueLight",
                      "CMPIObjectPath is NULL for BlueLight Class");
        return status;
      }
      CMSetNameSpace(lightPath, nameSpaceCharsOf(ref, &status));
      CMPIObjectPath* assocPath =
          CMNewObjectPath(mb, nameSpaceCharsOf(ref, &status), BlueLightSystemDeviceClass, &status);
      if (CMIsNullObject(assocPath)) {
        reportFailure(
            mb, component, &status,
            "Create CMPIObjectPath failed                     for BlueLightSystemDeviceProvider.",
            "Create CMPIObjectPath failed for                     BlueLightSystemDeviceClass.");
        return status;
      }
      CMSetNameSpace(assocPath, nameSpaceCharsOf(ref, &status));
      CMSetHostname(assocPath, Kesta::getSystemName().c_str());
      CMAddKey(assocPath, "GroupComponent", &systemEntry.value, CMPI_ref);
      CMAddKey(assocPath, "PartComponent", &lightPath, CMPI_ref);
      CMReturnObjectPath(result, assocPath);
    }
  }

  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, EXITING, parameters);
  CMReturnDone(result);
  return status;
}

CMPIStatus BlueLightSystemDevice_EnumInstances(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                               const CMPIResult* result, const CMPIObjectPath* ref,
                                               const char** properties) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " ref=" << ref
         << " properties=" << properties;
  };
  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  if (broker.load() == nullptr) return noBrokerStatus();

  std::vector<CMPIInstance*> instances;
  if (bluelightSystemDeviceCMPIInstances(ref, properties, ctx, instances) == 0) {
    returnInstances(result, instances);
  }

  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, EXITING, parameters);
  CMReturnDone(result);
  return status;
}

CMPIStatus BlueLightSystemDevice_GetInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                             const CMPIResult* result, const CMPIObjectPath* cop,
                                             const char** properties) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " cop=" << cop
         << " properties=" << properties;
  };
  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();

  if (keyCountOf(cop, &status) == 0) {
    failWithoutKeys(mb, BlueLightSystemDeviceProvider, &status);
  } else {
    if (mb == nullptr) return noBrokerStatus();
    std::vector<CMPIInstance*> instances;
    if (bluelightSystemDeviceCMPIInstances(cop, properties, ctx, instances) == 0) {
      returnFirstMatching(result, cop, instances, true, &status);
    }
  }

  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, EXITING, parameters);
  CMReturnDone(result);
  return status;
}

CMPIStatus BlueLightSystemDevice_CreateInstance(CMPIInstanceMI*, const CMPIContext*,
                                                const CMPIResult*, const CMPIObjectPath*,
                                                const CMPIInstance*) {
  return notSupportedStatus();
}

CMPIStatus BlueLightSystemDevice_ModifyInstance(CMPIInstanceMI*, const CMPIContext*,
                                                const CMPIResult*, const CMPIObjectPath*,
                                                const CMPIInstance*, const char**) {
  return notSupportedStatus();
}

CMPIStatus BlueLightSystemDevice_DeleteInstance(CMPIInstanceMI*, const CMPIContext*,
                                                const CMPIResult*, const CMPIObjectPath*) {
  return notSupportedStatus();
}

CMPIStatus BlueLightSystemDevice_ExecQuery(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                           const CMPIObjectPath*, const char*, const char*) {
  return notSupportedStatus();
}

// ---------------------------------------------------------------------------------------------
// Association operations. None of them calls CMReturnDone.
// ---------------------------------------------------------------------------------------------

namespace {

// Associators and AssociatorNames: the other end of every association from `ref`, as instances
// or, with `namesOnly`, as object paths. All calls use a status of their own, which becomes the
// operation's status at the end and on the failure returns. A request this association does not
// serve, or whose result class does not fit, ends silently with success; only a null association
// class from a source where this association does not start also asks for the exit line.
CMPIStatus associatedObjects(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIResult* result,
                             const CMPIObjectPath* ref, const char* assocClass,
                             const char* resultClass, const char** properties, bool namesOnly,
                             bool& traceExit) {
  CMPIStatus localStatus = okStatus();
  traceExit = false;

  BlueLightFactory factory(true, false);
  // Object managers pass a null association class when the client named none. From one of the
  // ends that can only mean this association. Some object managers send it to every association
  // provider of the namespace, whatever the source: where this association does not start, the
  // answer is nothing, with success, and it is logged as any operation that found nothing, so
  // that both association providers answer such a request alike.
  CMPIObjectPath* targetPath = factory.get_assoc_targetClass_ObjectPath(
      mb, ref, assocClass != nullptr ? assocClass : BlueLightSystemDeviceClass, resultClass,
      &localStatus);
  if (CMIsNullObject(targetPath)) {
    traceExit = assocClass == nullptr && !startsThisAssociation(ref);
    return okStatus();
  }

  const char* targetClass = classNameOf(targetPath, &localStatus);
  if (sameClass(targetClass, ComputerSystemClass)) {
    if (!acceptsResultClass(resultClass, "KESTA_ComputerSystem", "CIM_ComputerSystem")) {
      return okStatus();
    }
    // Every computer system of the namespace, as the broker gives them.
    CMPIEnumeration* systems = namesOnly
                                   ? CBEnumInstanceNames(mb, ctx, targetPath, &localStatus)
                                   : CBEnumInstances(mb, ctx, targetPath, nullptr, &localStatus);
    if (localStatus.rc != CMPI_RC_OK) {
      KESTA_TRACE(loggerBlueLightSystemDeviceProvider, kFailureTraceLevel, MESSAGE, kUpcallFailed);
      return localStatus;
    }
    while (hasNext(systems, &localStatus)) {
      CMPIData system = CMGetNext(systems, &localStatus);
      if (namesOnly) {
        CMReturnObjectPath(result, system.type == CMPI_ref ? system.value.ref : nullptr);
      } else {
        CMReturnInstance(result, system.type == CMPI_instance ? system.value.inst : nullptr);
      }
    }
  } else if (sameClass(targetClass, BlueLightClass)) {
    if (!acceptsResultClass(resultClass, "KESTA_BlueLight", "CIM_AlarmDevice")) {
      return okStatus();
    }
    if (namesOnly) {
      std::vector<CMPIObjectPath*> paths;
      paths.reserve(factory.getNumberOfInstances());
      if (factory.getAllBlueLightCMPIObjPaths(mb, ref, paths, &localStatus) != 0) {
        return localStatus;
      }
      const auto count = static_cast<unsigned short>(paths.size());
      for (unsigned short index = 0; index < count; ++index) {
        CMPIObjectPath* path = paths.at(index);
        CMSetNameSpace(path, nameSpaceCharsOf(ref, &localStatus));
        CMReturnObjectPath(result, path);
      }
    } else {
      std::vector<CMPIInstance*> instances;
      instances.reserve(factory.getNumberOfInstances());
      if (factory.getAllBlueLightCMPIInstances(mb, ref, properties, false, instances,
                                               &localStatus) != 0) {
        return localStatus;
      }
      returnInstances(result, instances);
    }
  }
  traceExit = true;
  return localStatus;
}

// References and ReferenceNames: the association objects that join `ref` to every object at the
// other end, all sharing one association path. Returns false when the operation must end at
// once with its status as it stands.
bool returnReferences(const CMPIBroker* mb, const CMPIContext* ctx, const CMPIResult* result,
                      const CMPIObjectPath* ref, const char* noTargetText, bool namesOnly,
                      CMPIStatus* status) {
  BlueLightFactory factory(true, false);
  CMPIObjectPath* targetPath = factory.get_assoc_targetClass_ObjectPath(
      mb, ref, BlueLightSystemDeviceClass, nullptr, status);
  if (CMIsNullObject(targetPath)) {
    reportFailure(mb, BlueLightSystemDeviceProvider, status, noTargetText, noTargetText);
    return false;
  }
  CMPIObjectPath* assocPath =
      CMNewObjectPath(mb, nameSpaceCharsOf(ref, status), BlueLightSystemDeviceClass, status);
  if (!CMIsNullObject(assocPath)) {
    CMSetNameSpace(assocPath, nameSpaceCharsOf(ref, status));
    CMSetHostname(assocPath, Kesta::getSystemName().c_str());
  }

  // Each pair is (GroupComponent, PartComponent).
  auto handOver = [&](const CMPIObjectPath* group, const CMPIObjectPath* part) {
    CMPIInstance* instance = CMNewInstance(mb, assocPath, status);
    // An instance the broker could not make is handed over as it is, with nothing set on it.
    if (!CMIsNullObject(instance)) {
      CMSetProperty(instance, "GroupComponent", &group, CMPI_ref);
      CMSetProperty(instance, "PartComponent", &part, CMPI_ref);
    }
    if (!namesOnly) {
      CMReturnInstance(result, instance);
      return;
    }
    CMPIObjectPath* name = CMIsNullObject(instance) ? nullptr : CMGetObjectPath(instance, status);
    if (!CMIsNullObject(name)) CMSetNameSpace(name, nameSpaceCharsOf(ref, status));
    CMReturnObjectPath(result, name);
  };

  const char* targetClass = classNameOf(targetPath, status);
  if (sameClass(targetClass, BlueLightClass)) {
    std::vector<CMPIObjectPath*> lights;
    lights.reserve(factory.getNumberOfInstances());
    if (factory.getAllBlueLightCMPIObjPaths(mb, ref, lights, status) != 0) return false;
    const auto count = static_cast<unsigned short>(lights.size());
    for (unsigned short index = 0; index < count; ++index) handOver(ref, lights.at(index));
  } else if (sameClass(targetClass, ComputerSystemClass)) {
    CMPIEnumeration* systems = CBEnumInstanceNames(mb, ctx, targetPath, status);
    if (status->rc != CMPI_RC_OK) {
      KESTA_TRACE(loggerBlueLightSystemDeviceProvider, kFailureTraceLevel, MESSAGE, kUpcallFailed);
      return false;
    }
    while (hasNext(systems, status)) {
      CMPIData system = CMGetNext(systems, status);
      if (system.type != CMPI_ref || CMIsNullObject(system.value.ref)) continue;
      handOver(system.value.ref, ref);
    }
  }
  return true;
}

}  // namespace

CMPIStatus BlueLightSystemDevice_Associators(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                             const CMPIResult* result, const CMPIObjectPath* ref,
                                             const char* assocClass, const char* resultClass,
                                             const char* role, const char* resultRole,
                                             const char** properties) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << mi;
    stream << " ctx=" << ctx << " result=" << result << " ref=" << ref
           << " _RefLeftClass=" << assocClass << " _RefRightClass=" << resultClass
           << " role=" << role << " resultRole=" << resultRole << " properties=" << properties;
  };
  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  bool traceExit = false;
  status = associatedObjects(mb, ctx, result, ref, assocClass, resultClass, properties, false,
                             traceExit);
  if (traceExit) {
    KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, EXITING, parameters);
  }
  return status;
}

CMPIStatus BlueLightSystemDevice_AssociatorNames(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                                 const CMPIResult* result,
                                                 const CMPIObjectPath* ref, const char* assocClass,
                                                 const char* resultClass, const char* role,
                                                 const char* resultRole) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << mi;
    stream << " ctx=" << ctx << " result=" << result << " ref=" << ref
           << " _RefLeftClass=" << assocClass << " _RefRightClass=" << resultClass
           << " role=" << role << " resultRole=" << resultRole;
  };
  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  bool traceExit = false;
  status =
      associatedObjects(mb, ctx, result, ref, assocClass, resultClass, nullptr, true, traceExit);
  if (traceExit) {
    KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, EXITING, parameters);
  }
  return status;
}

CMPIStatus BlueLightSystemDevice_References(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                            const CMPIResult* result, const CMPIObjectPath* ref,
                                            const char* resultClass, const char* role,
                                            const char** properties) {
  auto entryParameters = [&](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << mi;
    stream << " ctx=" << ctx << " result=" << result << " ref=" << ref
           << " resultClass=" << resultClass << " role=" << role << " properties=" << properties;
  };
  // The exit line has always spelt the last key with a run of blanks inside it.
  auto exitParameters = [&](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << mi;
    stream << " ctx=" << ctx << " result=" << result << " ref=" << ref
           << " resultClass=" << resultClass << " role=" << role
           << " p     roperties=" << properties;
  };
  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, ENTERING, entryParameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  if (!returnReferences(mb, ctx, result, ref, "Object Path is NULL in References.", false,
                        &status)) {
    return status;
  }

  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, EXITING, exitParameters);
  return status;
}

CMPIStatus BlueLightSystemDevice_ReferenceNames(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                                const CMPIResult* result, const CMPIObjectPath* ref,
                                                const char* resultClass, const char* role) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << mi;
    stream << " ctx=" << ctx << " result=" << result << " ref=" << ref
           << " resultClass=" << resultClass << " role=" << role;
  };
  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  if (!returnReferences(mb, ctx, result, ref, "Object Path is NULL in ReferenceNames.", true,
                        &status)) {
    return status;
  }

  KESTA_TRACE_PARA(loggerBlueLightSystemDeviceProvider, kTraceLevel, EXITING, parameters);
  return status;
}

namespace {

CMPIInstanceMIFT instMIFT__ = {
    CMPICurrentVersion,
    CMPICurrentVersion,
    "instanceBlueLightSystemDeviceProvider",
    BlueLightSystemDevice_Cleanup,
    BlueLightSystemDevice_EnumInstanceNames,
    BlueLightSystemDevice_EnumInstances,
    BlueLightSystemDevice_GetInstance,
    BlueLightSystemDevice_CreateInstance,
    BlueLightSystemDevice_ModifyInstance,
    BlueLightSystemDevice_DeleteInstance,
    BlueLightSystemDevice_ExecQuery,
};

CMPIAssociationMIFT assocMIFT__ = {
    CMPICurrentVersion,
    CMPICurrentVersion,
    "associationBlueLightSystemDeviceProvider",
    BlueLightSystemDevice_AssociationCleanup,
    BlueLightSystemDevice_Associators,
    BlueLightSystemDevice_AssociatorNames,
    BlueLightSystemDevice_References,
    BlueLightSystemDevice_ReferenceNames,
};

}  // namespace
}  // namespace BlueLightProvider
}  // namespace Kesta

CMPI_EXTERN_C CMPIInstanceMI* BlueLightSystemDeviceProvider_Create_InstanceMI(
    const CMPIBroker* brkr, const CMPIContext* /*ctx*/, CMPIStatus* /*rc*/) {
  static CMPIInstanceMI mi = {nullptr, &Kesta::BlueLightProvider::instMIFT__};
  Kesta::BlueLightProvider::broker.store(brkr);
  return &mi;
}

CMPI_EXTERN_C CMPIAssociationMI* BlueLightSystemDeviceProvider_Create_AssociationMI(
    const CMPIBroker* brkr, const CMPIContext* /*ctx*/, CMPIStatus* /*rc*/) {
  static CMPIAssociationMI mi = {nullptr, &Kesta::BlueLightProvider::assocMIFT__};
  Kesta::BlueLightProvider::broker.store(brkr);
  return &mi;
}
