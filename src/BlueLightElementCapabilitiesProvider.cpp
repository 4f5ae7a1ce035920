// The provider of KESTA_BlueLightElementCapabilities, the association of every blue light
// (ManagedElement) with the one capabilities record (Capabilities): its instances, and the walks
// from one end to the other.
#include <atomic>
#include <cstring>
#include <string>
#include <vector>

#include "BlueLightNames.h"
#include "BlueLightObjFactory.h"
#include "KestaCommon.h"
#include "KestaTrace.h"
#include "ProviderFrame.h"

namespace Kesta {
namespace BlueLightProvider {

// Logger category of this unit.
static const std::string loggerBlueLightElementCapabilitiesProvider(
    "Varnel.BlueLightElementCapabilitiesProvider");

namespace {

constexpr const char* kSourceFile = "BlueLightElementCapabilitiesProvider.cpp";

// The broker handed to the MI factory functions (instance and association share it); null until
// one of them has run. Operations read it once.
std::atomic<const CMPIBroker*> broker{nullptr};

// Whether the class name of a target path is one of the two ends of this association.
bool isLightClass(const char* className) {
  return className != nullptr && std::strcmp(className, BlueLightClass) == 0;
}
bool isCapabilitiesClass(const char* className) {
  return className != nullptr && std::strcmp(className, BlueLightCapabilitiesClass) == 0;
}

// The class name of a target path, read straight from the string's handle.
const char* classNameOf(const CMPIObjectPath* path, CMPIStatus* status) {
  CMPIString* name = CMGetClassName(path, status);
  return name != nullptr ? CMGetCharPtr(name) : nullptr;
}

// Whether the source of an association walk is one of the two ends, by its class alone. Only
// asked when no association class came and no far end was found, so that a request naming this
// association meets no additional broker call.
bool startsThisAssociation(const CMPIObjectPath* source) {
  if (!isUsable(source)) return false;
  const char* className = classNameOf(source, nullptr);
  return isLightClass(className) || isCapabilitiesClass(className);
}

}  // namespace

// One association instance for every (light, capabilities record) pair, in the namespace of
// `ref`. 0 on success; 1 on failure, reported to the broker's trace only.
int bluelightElementCapabilitiesCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                              std::vector<CMPIInstance*>& instances) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " ref=" << ref << " properties=" << properties << " instances=" << &instances;
  };
  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus localStatus = okStatus();
  const CMPIBroker* const mb = broker.load();
  const char* const component = BlueLightElementCapabilitiesProvider;
  // The key list names the association's generic roles, not the properties set below; with a
  // property list the references are therefore set only when they are listed.
  const char* keyList[] = {"Antecedent", "Dependent", nullptr};

  BlueLightFactory factory(true, true);
  instances.reserve(factory.getNumberOfInstances());

  std::vector<CMPIObjectPath*> lightPaths;
  if (factory.getAllBlueLightCMPIObjPaths(mb, ref, lightPaths, &localStatus) != 0) {
    traceToBroker(mb, kBrokerTraceWarning, component,
                  "***Can't get BlueLight ObjectPaths.             Exiting "
                  "EnumerateInstanceNames***");
    return 1;
  }

  const auto lightCount = static_cast<unsigned short>(lightPaths.size());
  for (unsigned short i = 0; i < lightCount; ++i) {
    CMPIObjectPath* lightPath = lightPaths.at(i);
    if (CMIsNullObject(lightPath)) {
      reportFailure(mb, component, &localStatus,
                    "CMPIObjectPath is                 NULL for BlueLight",
                    "CMPIObjectPath is NULL for BlueLight");
      return 1;
    }
    CMSetNameSpace(lightPath, nameSpaceCharsOf(ref, &localStatus));

    std::vector<CMPIObjectPath*> capPaths;
    factory.getNumberOfInstances();
    capPaths.reserve(1);
    if (factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb, ref, capPaths, &localStatus) != 0) {
      traceToBroker(mb, kBrokerTraceWarning, component,
                    "***Can't get ObjectPaths for                 Capabilities                 "
                    "Exiting EnumerateInstanceNames***");
      return 1;
    }

    const auto capCount = static_cast<unsigned short>(capPaths.size());
    for (unsigned short j = 0; j < capCount; ++j) {
      // It is the light path that is checked again here, not the capabilities path.
      if (CMIsNullObject(lightPath)) {
        reportFailure(mb, component, &localStatus,
                      "CMPIObjectPath is                     NULL for Capabilities",
                      "CMPIObjectPath is NULL for Capabilities");
        return 1;
      }
      CMSetNameSpace(capPaths.at(j), nameSpaceCharsOf(ref, &localStatus));
      CMPIObjectPath* assocPath = CMNewObjectPath(mb, nameSpaceCharsOf(ref, &localStatus),
                                                  BlueLightElementCapabilitiesClass, &localStatus);
      if (CMIsNullObject(assocPath)) {
        reportFailure(mb, component, &localStatus,
                      "Create CMPIObjectPath failed for ElementCapabilities",
                      "Create CMPIObjectPath failed for ElementCapabilities.");
        return 1;
      }
      CMSetNameSpace(assocPath, nameSpaceCharsOf(ref, &localStatus));
      CMSetHostname(assocPath, Kesta::getSystemName().c_str());
      CMPIInstance* instance = CMNewInstance(mb, assocPath, nullptr);
      if (!CMIsNullObject(instance)) {
        CMSetPropertyFilter(instance, properties, keyList);
        CMSetProperty(instance, "ManagedElement", &lightPath, CMPI_ref);
        CMSetProperty(instance, "Capabilities", &capPaths.at(j), CMPI_ref);
      }
      instances.push_back(instance);
    }
  }

  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  return 0;
}

CMPIStatus BlueLightElementCapabilities_Cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
  return okStatus();
}

CMPIStatus BlueLightElementCapabilities_AssociationCleanup(CMPIAssociationMI*, const CMPIContext*,
                                                           CMPIBoolean) {
  return okStatus();
}

CMPIStatus BlueLightElementCapabilities_EnumInstanceNames(CMPIInstanceMI* mi,
                                                          const CMPIContext* ctx,
                                                          const CMPIResult* result,
                                                          const CMPIObjectPath* ref) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " ref=" << ref;
  };
  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();
  const char* const component = BlueLightElementCapabilitiesProvider;

  // The names are made here rather than by the instance builder, and each is handed over as soon
  // as it is made.
  BlueLightFactory factory(true, true);
  std::vector<CMPIObjectPath*> lightPaths;
  lightPaths.reserve(factory.getNumberOfInstances());
  if (factory.getAllBlueLightCMPIObjPaths(mb, ref, lightPaths, &status) != 0) return status;

  const auto lightCount = static_cast<unsigned short>(lightPaths.size());
  for (unsigned short i = 0; i < lightCount; ++i) {
    CMPIObjectPath* lightPath = lightPaths.at(i);
    if (CMIsNullObject(lightPath)) {
      reportFailure(mb, component, &status, "CMPIObjectPath is NULL for BlueLight class",
                    "CMPIObjectPath is NULL for BlueLight class");
      return status;
    }
    std::vector<CMPIObjectPath*> capPaths;
    capPaths.reserve(1);
    if (factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb, ref, capPaths, &status) != 0) {
      return status;
    }
    const auto capCount = static_cast<unsigned short>(capPaths.size());
    for (unsigned short j = 0; j < capCount; ++j) {
      CMPIObjectPath* capPath = capPaths.at(j);
      if (CMIsNullObject(capPath)) {
        reportFailure(mb, component, &status,
                      "CMPIObjectPath is                     NULL for BlueLightCapabilities",
                      "CMPIObjectPath is NULL for                     Capabilities");
        return status;
      }
      CMPIObjectPath* assocPath = CMNewObjectPath(mb, nameSpaceCharsOf(ref, &status),
                                                  BlueLightElementCapabilitiesClass, &status);
      if (CMIsNullObject(assocPath)) {
        reportFailure(mb, component, &status,
                      "Create CMPIObjectPath failed                     for ElementCapabilities",
                      "Create CMPIObjectPath failed                     for ElementCapabilities.");
        return status;
      }
      CMSetNameSpace(assocPath, nameSpaceCharsOf(ref, &status));
      CMSetHostname(assocPath, Kesta::getSystemName().c_str());
      CMAddKey(assocPath, "ManagedElement", &lightPath, CMPI_ref);
      CMAddKey(assocPath, "Capabilities", &capPath, CMPI_ref);
      CMReturnObjectPath(result, assocPath);
    }
  }

  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  CMReturnDone(result);
  return status;
}

CMPIStatus BlueLightElementCapabilities_EnumInstances(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                                      const CMPIResult* result,
                                                      const CMPIObjectPath* ref,
                                                      const char** properties) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " ref=" << ref
         << " properties=" << properties;
  };
  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  if (broker.load() == nullptr) return noBrokerStatus();

  // A failing builder has already said why in the broker's trace; the enumeration itself still
  // ends normally.
  std::vector<CMPIInstance*> instances;
  if (bluelightElementCapabilitiesCMPIInstances(ref, properties, instances) == 0) {
    returnInstances(result, instances);
  }

  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  CMReturnDone(result);
  return status;
}

CMPIStatus BlueLightElementCapabilities_GetInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                                    const CMPIResult* result,
                                                    const CMPIObjectPath* cop,
                                                    const char** properties) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " cop=" << cop
         << " properties=" << properties;
  };
  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();

  if (keyCountOf(cop, &status) == 0) {
    failWithoutKeys(mb, BlueLightElementCapabilitiesProvider, &status);
  } else {
    if (mb == nullptr) return noBrokerStatus();
    // The requested path stands in for the enumeration's path, so every pair is built in its
    // namespace.
    std::vector<CMPIInstance*> instances;
    if (bluelightElementCapabilitiesCMPIInstances(cop, properties, instances) == 0) {
      returnFirstMatching(result, cop, instances, true, &status);
    }
  }

  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  CMReturnDone(result);
  return status;
}

CMPIStatus BlueLightElementCapabilities_CreateInstance(CMPIInstanceMI*, const CMPIContext*,
                                                       const CMPIResult*, const CMPIObjectPath*,
                                                       const CMPIInstance*) {
  return notSupportedStatus();
}

CMPIStatus BlueLightElementCapabilities_ModifyInstance(CMPIInstanceMI*, const CMPIContext*,
                                                       const CMPIResult*, const CMPIObjectPath*,
                                                       const CMPIInstance*, const char**) {
  return notSupportedStatus();
}

CMPIStatus BlueLightElementCapabilities_DeleteInstance(CMPIInstanceMI*, const CMPIContext*,
                                                       const CMPIResult*, const CMPIObjectPath*) {
  return notSupportedStatus();
}

CMPIStatus BlueLightElementCapabilities_ExecQuery(CMPIInstanceMI*, const CMPIContext*,
                                                  const CMPIResult*, const CMPIObjectPath*,
                                                  const char*, const char*) {
  return notSupportedStatus();
}

// ---------------------------------------------------------------------------------------------
// Association operations. None of them calls CMReturnDone.
// ---------------------------------------------------------------------------------------------

CMPIStatus BlueLightElementCapabilities_Associators(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                                    const CMPIResult* result,
                                                    const CMPIObjectPath* ref,
                                                    const char* assocClass, const char* resultClass,
                                                    const char* role, const char* resultRole,
                                                    const char** properties) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << mi;
    stream << " ctx=" << ctx << " result=" << result << " ref=" << ref
           << " _RefLeftClass=" << assocClass << " _RefRightClass=" << resultClass
           << " role=" << role << " resultRole=" << resultRole << " properties=" << properties;
  };
  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  BlueLightFactory factory(true, true);
  std::vector<CMPIInstance*> instances;
  instances.reserve(factory.getNumberOfInstances());

  // Object managers pass a null association class when the client named none. From one of the
  // ends that can only mean this association. Some object managers send it to every association
  // provider of the namespace, whatever the source: where this association does not start,
  // there is nothing to add, and a failure here would fail the whole request, the other
  // providers' answers included. So that case ends with success and nothing, as an operation
  // that found nothing does.
  CMPIObjectPath* targetPath = factory.get_assoc_targetClass_ObjectPath(
      mb, ref, assocClass != nullptr ? assocClass : BlueLightElementCapabilitiesClass, resultClass,
      &status);
  if (CMIsNullObject(targetPath)) {
    if (assocClass == nullptr && !startsThisAssociation(ref)) {
      KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING,
                       parameters);
      return okStatus();
    }
    const char* const text = "Object Path is NULL in Associators.";
    reportFailure(mb, BlueLightElementCapabilitiesProvider, &status, text, text);
    return status;
  }

  const char* targetClass = classNameOf(targetPath, &status);
  int found = 0;
  if (isLightClass(targetClass)) {
    found = factory.getAllBlueLightCMPIInstances(mb, ref, properties, false, instances, &status);
  } else if (isCapabilitiesClass(targetClass)) {
    found = factory.getAllBlueLightCapabilitiesCMPIInstances(mb, ref, properties, false, instances,
                                                             &status);
  }
  if (found != 0) return status;
  returnInstances(result, instances);

  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  return status;
}

CMPIStatus BlueLightElementCapabilities_AssociatorNames(
    CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* result,
    const CMPIObjectPath* ref, const char* assocClass, const char* resultClass, const char* role,
    const char* resultRole) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << mi;
    stream << " ctx=" << ctx << " result=" << result << " ref=" << ref
           << " _RefLeftClass=" << assocClass << " _RefRightClass=" << resultClass
           << " role=" << role << " resultRole=" << resultRole;
  };
  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  BlueLightFactory factory(true, true);
  std::vector<CMPIObjectPath*> paths;
  paths.reserve(factory.getNumberOfInstances());

  CMPIObjectPath* targetPath = factory.get_assoc_targetClass_ObjectPath(
      mb, ref, assocClass != nullptr ? assocClass : BlueLightElementCapabilitiesClass, resultClass,
      &status);
  if (CMIsNullObject(targetPath)) {
    // As in Associators: a null association class from a source where this association does not
    // start gets nothing, with success.
    if (assocClass == nullptr && !startsThisAssociation(ref)) {
      KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING,
                       parameters);
      return okStatus();
    }
    // "AssociatorsNames" is the operation's own long-standing spelling.
    const char* const text = "Object Path is NULL in AssociatorsNames.";
    reportFailure(mb, BlueLightElementCapabilitiesProvider, &status, text, text);
    return status;
  }

  const char* targetClass = classNameOf(targetPath, &status);
  int found = 0;
  if (isLightClass(targetClass)) {
    found = factory.getAllBlueLightCMPIObjPaths(mb, ref, paths, &status);
  } else if (isCapabilitiesClass(targetClass)) {
    found = factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb, ref, paths, &status);
  }
  if (found != 0) return status;

  const auto count = static_cast<unsigned short>(paths.size());
  for (unsigned short index = 0; index < count; ++index) {
    CMPIObjectPath* path = paths.at(index);
    CMSetNameSpace(path, nameSpaceCharsOf(ref, &status));
    CMReturnObjectPath(result, path);
  }

  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  return status;
}

namespace {

// The association objects that join `ref` to every object at the other end, all sharing one
// association path. Handed over as instances, or as their object paths when `namesOnly`.
// Returns false when the operation must end at once with its status as it stands.
bool returnReferences(const CMPIBroker* mb, const CMPIResult* result, const CMPIObjectPath* ref,
                      BlueLightFactory& factory, const char* noTargetText, bool namesOnly,
                      CMPIStatus* status) {
  CMPIObjectPath* targetPath = factory.get_assoc_targetClass_ObjectPath(
      mb, ref, BlueLightElementCapabilitiesClass, nullptr, status);
  if (CMIsNullObject(targetPath)) {
    reportFailure(mb, BlueLightElementCapabilitiesProvider, status, noTargetText, noTargetText);
    return false;
  }
  const char* targetClass = classNameOf(targetPath, status);

  CMPIObjectPath* assocPath =
      CMNewObjectPath(mb, nameSpaceCharsOf(ref, status), BlueLightElementCapabilitiesClass, status);
  if (!CMIsNullObject(assocPath)) {
    CMSetNameSpace(assocPath, nameSpaceCharsOf(ref, status));
    CMSetHostname(assocPath, Kesta::getSystemName().c_str());
  }

  std::vector<CMPIObjectPath*> others;
  others.reserve(factory.getNumberOfInstances());
  int found = 0;
  if (isLightClass(targetClass)) {
    found = factory.getAllBlueLightCMPIObjPaths(mb, ref, others, status);
  } else if (isCapabilitiesClass(targetClass)) {
    found = factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb, ref, others, status);
  }
  if (found != 0) return false;

  const auto count = static_cast<unsigned short>(others.size());
  for (unsigned short index = 0; index < count; ++index) {
    CMPIObjectPath* other = others.at(index);
    CMPIInstance* instance = CMNewInstance(mb, assocPath, status);
    // An instance the broker could not make is handed over as it is, with nothing set on it.
    if (!CMIsNullObject(instance)) {
      if (isLightClass(targetClass)) {
        CMSetProperty(instance, "ManagedElement", &other, CMPI_ref);
        CMSetProperty(instance, "Capabilities", &ref, CMPI_ref);
      } else if (isCapabilitiesClass(targetClass)) {
        CMSetProperty(instance, "ManagedElement", &ref, CMPI_ref);
        CMSetProperty(instance, "Capabilities", &other, CMPI_ref);
      }
    }
    if (!namesOnly) {
      CMReturnInstance(result, instance);
    } else {
      CMPIObjectPath* name = CMIsNullObject(instance) ? nullptr : CMGetObjectPath(instance, status);
      if (!CMIsNullObject(name)) CMSetNameSpace(name, nameSpaceCharsOf(ref, status));
      CMReturnObjectPath(result, name);
    }
  }
  return true;
}

}  // namespace

CMPIStatus BlueLightElementCapabilities_References(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                                   const CMPIResult* result,
                                                   const CMPIObjectPath* ref,
                                                   const char* resultClass, const char* role,
                                                   const char** properties) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << mi;
    stream << " ctx=" << ctx << " result=" << result << " ref=" << ref
           << " resultClass=" << resultClass << " role=" << role << " properties=" << properties;
  };
  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  BlueLightFactory factory(true, true);
  if (!returnReferences(mb, result, ref, factory, "Object Path is NULL in References.", false,
                        &status)) {
    return status;
  }

  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  return status;
}

CMPIStatus BlueLightElementCapabilities_ReferenceNames(CMPIAssociationMI* mi,
                                                       const CMPIContext* ctx,
                                                       const CMPIResult* result,
                                                       const CMPIObjectPath* ref,
                                                       const char* resultClass, const char* role) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << mi;
    stream << " ctx=" << ctx << " result=" << result << " ref=" << ref
           << " resultClass=" << resultClass << " role=" << role;
  };
  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  BlueLightFactory factory(true, true);
  if (!returnReferences(mb, result, ref, factory, "Object Path is NULL in ReferenceNames.", true,
                        &status)) {
    return status;
  }

  KESTA_TRACE_PARA(loggerBlueLightElementCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  return status;
}

namespace {

CMPIInstanceMIFT instMIFT__ = {
    CMPICurrentVersion,
    CMPICurrentVersion,
    "instanceBlueLightElementCapabilitiesProvider",
    BlueLightElementCapabilities_Cleanup,
    BlueLightElementCapabilities_EnumInstanceNames,
    BlueLightElementCapabilities_EnumInstances,
    BlueLightElementCapabilities_GetInstance,
    BlueLightElementCapabilities_CreateInstance,
    BlueLightElementCapabilities_ModifyInstance,
    BlueLightElementCapabilities_DeleteInstance,
    BlueLightElementCapabilities_ExecQuery,
};

CMPIAssociationMIFT assocMIFT__ = {
    CMPICurrentVersion,
    CMPICurrentVersion,
    "associationBlueLightElementCapabilitiesProvider",
    BlueLightElementCapabilities_AssociationCleanup,
    BlueLightElementCapabilities_Associators,
    BlueLightElementCapabilities_AssociatorNames,
    BlueLightElementCapabilities_References,
    BlueLightElementCapabilities_ReferenceNames,
};

}  // namespace
}  // namespace BlueLightProvider
}  // namespace Kesta

CMPI_EXTERN_C CMPIInstanceMI* BlueLightElementCapabilitiesProvider_Create_InstanceMI(
    const CMPIBroker* brkr, const CMPIContext* /*ctx*/, CMPIStatus* /*rc*/) {
  static CMPIInstanceMI mi = {nullptr, &Kesta::BlueLightProvider::instMIFT__};
  Kesta::BlueLightProvider::broker.store(brkr);
  return &mi;
}

CMPI_EXTERN_C CMPIAssociationMI* BlueLightElementCapabilitiesProvider_Create_AssociationMI(
    const CMPIBroker* brkr, const CMPIContext* /*ctx*/, CMPIStatus* /*rc*/) {
  static CMPIAssociationMI mi = {nullptr, &Kesta::BlueLightProvider::assocMIFT__};
  Kesta::BlueLightProvider::broker.store(brkr);
  return &mi;
}
