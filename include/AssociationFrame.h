// The frame of the two association providers. Both pair each object at one end with each object
// at the other and answer the same seven read operations the same way; what sets them apart is
// data (an Association: the classes, the ends and where their objects come from, the texts, a
// few long-standing quirks) and each provider's own walk over the pairs (its instance builder
// and its EnumInstanceNames), which stays in its file and is built from the pieces here.
//
// The frame writes the entry and exit lines on behalf of the provider's function that calls it:
// the lines name that function (TraceSite) and the provider's file and logger category.
#ifndef KESTA_ASSOCIATIONFRAME_H
#define KESTA_ASSOCIATIONFRAME_H

#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>

#include <cstring>
#include <string>
#include <vector>

#include "BlueLightNames.h"
#include "BlueLightObjFactory.h"
#include "BrokerReport.h"
#include "KestaCommon.h"
#include "KestaTrace.h"
#include "ProviderFrame.h"
#include "text/Text.h"

namespace Kesta {
namespace BlueLightProvider {
namespace {

// Where the objects at one end of an association come from.
enum class EndSource {
  Lights,           // the factory's lights
  Capabilities,     // the factory's capabilities record
  ComputerSystems,  // another provider, asked through the broker's up-calls
};

// One end of an association.
struct AssociationEnd {
  const char* className;  // the class of the objects at this end
  const char* role;       // the association's reference property that holds them
  EndSource source;
  // The two result classes that admit this end in Associators and AssociatorNames, in any
  // letter case; with none (null), every result class does.
  const char* servedResultClass;
  const char* schemaResultClass;

  // Whether a result class named by the client admits this end. CIM names are ASCII, so the
  // letter case is folded as ASCII's, whatever the locale. A null result class admits any end.
  bool admits(const char* resultClass) const {
    return servedResultClass == nullptr || resultClass == nullptr ||
           platform::equalsIgnoringCase(resultClass, servedResultClass) ||
           platform::equalsIgnoringCase(resultClass, schemaResultClass);
  }
};

// What one association provider is, beyond its own walks over the pairs.
struct Association {
  const char* className;
  const char* component;      // the provider that the broker's trace names
  const std::string& logger;  // the provider file's logger category
  const char* sourceFile;     // the provider file, as its lines name it
  bool collectCapabilities;   // whether the factory collects the capabilities besides the lights
  AssociationEnd first;       // the end whose reference is set first
  AssociationEnd second;
  // The key list of the property filter of every built association instance.
  const char* filterKeys[2];
  // The failure texts of Associators and AssociatorNames when no far end is found; null when
  // that ends them silently, with success.
  const char* associatorsNoTarget;
  const char* associatorNamesNoTarget;
  // Whether References and ReferenceNames read the class of the far end before they make the
  // association path that all their instances share, or after.
  bool referencesReadTargetClassFirst;
  // The key of the property list in the exit line of References.
  const char* referencesExitPropertiesKey;

  // The end whose class is `className`, or null.
  const AssociationEnd* endOfClass(const char* className) const {
    if (className == nullptr) return nullptr;
    if (std::strcmp(className, first.className) == 0) return &first;
    if (std::strcmp(className, second.className) == 0) return &second;
    return nullptr;
  }
};

// The texts that a failure is reported with: the status message and the broker's trace.
struct FailureTexts {
  const char* status;
  const char* trace;
};

// True when `object` can be used; otherwise the failure is reported with `failure`.
template <typename T>
bool usableOrReported(const Association& association, const CMPIBroker* mb, const T* object,
                      CMPIStatus* status, const FailureTexts& failure) {
  if (!CMIsNullObject(object)) return true;
  reportFailure(mb, association.component, status, failure.status, failure.trace);
  return false;
}

// The class name of a path, read straight from the string's handle.
inline const char* classNameOf(const CMPIObjectPath* path, CMPIStatus* status) {
  CMPIString* name = CMGetClassName(path, status);
  return name != nullptr ? CMGetCharPtr(name) : nullptr;
}

// Calls `each(path)` for the paths in order, until it returns false; the count is taken in 16
// bits, like every count of the module. True when every path was walked.
template <typename Each>
bool walkPaths(const std::vector<CMPIObjectPath*>& paths, Each&& each) {
  const auto count = static_cast<unsigned short>(paths.size());
  for (unsigned short index = 0; index < count; ++index) {
    if (!each(paths.at(index))) return false;
  }
  return true;
}

// True when an entry of an enumeration of names is the path of an object; anything else the
// broker might yield is passed by.
inline bool namesAnObject(const CMPIData& entry) {
  return entry.type == CMPI_ref && !CMIsNullObject(entry.value.ref);
}

// Calls `each(entry)` for every computer system that the broker gives for the class path
// `systemsPath`, their names or, with `instances`, the instances, until it returns false. A
// failed up-call is logged (`status` tells why). True when every entry was walked.
template <typename Each>
bool forEachComputerSystem(const Association& association, const TraceSite& site,
                           const CMPIBroker* mb, const CMPIContext* ctx,
                           const CMPIObjectPath* systemsPath, bool instances, CMPIStatus* status,
                           Each&& each) {
  CMPIEnumeration* systems = instances ? CBEnumInstances(mb, ctx, systemsPath, nullptr, status)
                                       : CBEnumInstanceNames(mb, ctx, systemsPath, status);
  if (status->rc != CMPI_RC_OK) {
    emitTrace(site.function, association.sourceFile, site.line, association.logger,
              kFailureTraceLevel, MESSAGE, "Call to CBEnumInstances of target Class Failed.");
    return false;
  }
  while (!CMIsNullObject(systems) && CMHasNext(systems, status) != 0) {
    if (!each(CMGetNext(systems, status))) return false;
  }
  return true;
}

// A new association path in the namespace of `ref`, with this system as host. Null (or without a
// handle) when the broker could not make it.
inline CMPIObjectPath* newAssociationPath(const Association& association, const CMPIBroker* mb,
                                          const CMPIObjectPath* ref, CMPIStatus* status) {
  CMPIObjectPath* path =
      CMNewObjectPath(mb, nameSpaceCharsOf(ref, status), association.className, status);
  if (!CMIsNullObject(path)) {
    CMSetNameSpace(path, nameSpaceCharsOf(ref, status));
    CMSetHostname(path, Kesta::getSystemName().c_str());
  }
  return path;
}

// Appends a new association instance joining `firstEnd` and `secondEnd`, in the namespace of
// `ref`, with the client's property list applied; an instance that the broker could not make is
// appended as it is, with nothing set on it. When the broker makes no association path, that is
// reported with `failure`, nothing is appended, and the result is false.
inline bool appendAssociation(const Association& association, const CMPIBroker* mb,
                              const CMPIObjectPath* ref, const char** properties,
                              const CMPIObjectPath* firstEnd, const CMPIObjectPath* secondEnd,
                              std::vector<CMPIInstance*>& instances, CMPIStatus* status,
                              const FailureTexts& failure) {
  CMPIObjectPath* assocPath = newAssociationPath(association, mb, ref, status);
  if (!usableOrReported(association, mb, assocPath, status, failure)) return false;
  CMPIInstance* instance = CMNewInstance(mb, assocPath, nullptr);
  if (!CMIsNullObject(instance)) {
    const char* keyList[] = {association.filterKeys[0], association.filterKeys[1], nullptr};
    CMSetPropertyFilter(instance, properties, keyList);
    CMSetProperty(instance, association.first.role, &firstEnd, CMPI_ref);
    CMSetProperty(instance, association.second.role, &secondEnd, CMPI_ref);
  }
  instances.push_back(instance);
  return true;
}

// Hands over the name of the association joining `firstEnd` and `secondEnd`, in the namespace of
// `ref`. When the broker makes no association path, that is reported with `failure` and the
// result is false.
inline bool returnAssociationName(const Association& association, const CMPIBroker* mb,
                                  const CMPIObjectPath* ref, const CMPIResult* result,
                                  const CMPIObjectPath* firstEnd, const CMPIObjectPath* secondEnd,
                                  CMPIStatus* status, const FailureTexts& failure) {
  CMPIObjectPath* assocPath = newAssociationPath(association, mb, ref, status);
  if (!usableOrReported(association, mb, assocPath, status, failure)) return false;
  CMAddKey(assocPath, association.first.role, &firstEnd, CMPI_ref);
  CMAddKey(assocPath, association.second.role, &secondEnd, CMPI_ref);
  CMReturnObjectPath(result, assocPath);
  return true;
}

// ---- Instance operations ---------------------------------------------------------------------

// The frame of a provider's instance builder, whose entry and exit lines name it (`site`): a
// factory for the provider's own walk over the pairs, `buildEach(factory, status)`, which
// appends one instance a pair and returns false when it failed (having said why in the broker's
// trace). The status is the builder's own; its failures never reach the operation's. 0 on
// success, 1 on failure.
template <typename Parameters, typename Walk>
int buildAssociations(const Association& association, const TraceSite& site,
                      Parameters&& parameters, Walk&& buildEach) {
  emitTracePara(site, association.sourceFile, association.logger, kTraceLevel, ENTERING,
                parameters);
  CMPIStatus localStatus = okStatus();
  BlueLightFactory factory(true, association.collectCapabilities);
  if (!buildEach(factory, localStatus)) return 1;
  emitTracePara(site, association.sourceFile, association.logger, kTraceLevel, EXITING, parameters);
  return 0;
}

// The arguments of the instance operations: `path` is the enumeration's (EnumInstanceNames, which
// has no property list, and EnumInstances) or the requested one (GetInstance).
struct InstanceCall {
  CMPIInstanceMI* mi;
  const CMPIContext* ctx;
  const CMPIResult* result;
  const CMPIObjectPath* path;
  const char** properties;
};

// False, with the status of an operation called before its MI factory function ran, when there
// is no broker.
inline bool brokerGiven(const CMPIBroker* mb, CMPIStatus& status) {
  if (mb != nullptr) return true;
  status = noBrokerStatus();
  return false;
}

// Runs an instance operation between its entry line and, when `body(status)` returns true, its
// exit line and CMReturnDone. The status starts OK; when the body returns false, the operation
// ends at once with the status as it stands.
template <typename Parameters, typename Body>
CMPIStatus tracedInstanceOperation(const Association& association, const TraceSite& site,
                                   const CMPIResult* result, Parameters&& parameters, Body&& body) {
  emitTracePara(site, association.sourceFile, association.logger, kTraceLevel, ENTERING,
                parameters);
  CMPIStatus status = okStatus();
  if (!body(status)) return status;
  emitTracePara(site, association.sourceFile, association.logger, kTraceLevel, EXITING, parameters);
  CMReturnDone(result);
  return status;
}

// EnumInstanceNames: a factory for the provider's own walk over the pairs,
// `nameEach(factory, status)`, which hands over each name as soon as it is made and returns
// false when the operation must end at once with its status as it stands (no exit line, no
// CMReturnDone; names handed over stay handed over).
template <typename Walk>
CMPIStatus enumerateAssociationNames(const Association& association, const TraceSite& site,
                                     const CMPIBroker* mb, const InstanceCall& call,
                                     Walk&& nameEach) {
  return tracedInstanceOperation(association, site, call.result,
                                 enumerationParameters(call.mi, call.ctx, call.result, call.path),
                                 [&](CMPIStatus& status) {
                                   if (!brokerGiven(mb, status)) return false;
                                   BlueLightFactory factory(true, association.collectCapabilities);
                                   return nameEach(factory, status);
                                 });
}

// EnumInstances: every instance that `build(ref, properties, instances)` makes (0 on success),
// null ones included. A failing builder has already said why in the broker's trace; the
// enumeration itself still ends normally.
template <typename Builder>
CMPIStatus enumerateAssociations(const Association& association, const TraceSite& site,
                                 const CMPIBroker* mb, const InstanceCall& call, Builder&& build) {
  return tracedInstanceOperation(
      association, site, call.result,
      instanceParameters(call.mi, call.ctx, call.result, " ref=", call.path, call.properties),
      [&](CMPIStatus& status) {
        if (!brokerGiven(mb, status)) return false;
        std::vector<CMPIInstance*> instances;
        if (build(call.path, call.properties, instances) == 0) {
          returnInstances(call.result, instances);
        }
        return true;
      });
}

// GetInstance: the first instance that `build(cop, properties, instances)` makes whose path
// names the requested one. The requested path stands in for the enumeration's, so every pair is
// built in its namespace. Finding none is no failure.
template <typename Builder>
CMPIStatus getAssociation(const Association& association, const TraceSite& site,
                          const CMPIBroker* mb, const InstanceCall& call, Builder&& build) {
  return tracedInstanceOperation(
      association, site, call.result,
      instanceParameters(call.mi, call.ctx, call.result, " cop=", call.path, call.properties),
      [&](CMPIStatus& status) {
        if (keyCountOf(call.path, &status) == 0) {
          failWithoutKeys(mb, association.component, &status);
          return true;
        }
        if (!brokerGiven(mb, status)) return false;
        std::vector<CMPIInstance*> instances;
        if (build(call.path, call.properties, instances) == 0) {
          returnFirstMatching(call.result, call.path, instances, true, &status);
        }
        return true;
      });
}

// ---- Association operations ------------------------------------------------------------------
// None of them calls CMReturnDone.

// How an association walk ended: its status, and whether it ran to its end (and so is followed
// by the exit line) or stopped early.
struct WalkOutcome {
  CMPIStatus status;
  bool finished;
};

// Runs an association walk between the entry line and, when the walk ran to its end, the exit
// line. Without a broker there is no walk.
template <typename EntryParameters, typename ExitParameters, typename Walk>
CMPIStatus tracedWalk(const Association& association, const TraceSite& site, const CMPIBroker* mb,
                      EntryParameters&& entryParameters, ExitParameters&& exitParameters,
                      Walk&& walk) {
  emitTracePara(site, association.sourceFile, association.logger, kTraceLevel, ENTERING,
                entryParameters);
  if (mb == nullptr) return noBrokerStatus();
  const WalkOutcome outcome = walk();
  if (outcome.finished) {
    emitTracePara(site, association.sourceFile, association.logger, kTraceLevel, EXITING,
                  exitParameters);
  }
  return outcome.status;
}

// Whether the source of an association walk is at one of the ends, by its class alone. Only
// asked when no association class came and no far end was found, so that a request naming the
// association meets no additional broker call.
inline bool startsAt(const Association& association, const CMPIObjectPath* source) {
  return isUsable(source) && association.endOfClass(classNameOf(source, nullptr)) != nullptr;
}

// The paths of every object at a factory-made end.
inline int factoryPaths(BlueLightFactory& factory, EndSource source, const CMPIBroker* mb,
                        const CMPIObjectPath* ref, std::vector<CMPIObjectPath*>& paths,
                        CMPIStatus* status) {
  return source == EndSource::Lights
             ? factory.getAllBlueLightCMPIObjPaths(mb, ref, paths, status)
             : factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb, ref, paths, status);
}

// The instances of every object at a factory-made end.
inline int factoryInstances(BlueLightFactory& factory, EndSource source, const CMPIBroker* mb,
                            const CMPIObjectPath* ref, const char** properties,
                            std::vector<CMPIInstance*>& instances, CMPIStatus* status) {
  return source == EndSource::Lights
             ? factory.getAllBlueLightCMPIInstances(mb, ref, properties, false, instances, status)
             : factory.getAllBlueLightCapabilitiesCMPIInstances(mb, ref, properties, false,
                                                                instances, status);
}

// The arguments of the association operations. References and ReferenceNames take no
// association class and no result role, AssociatorNames and ReferenceNames no property list.
struct AssociationCall {
  CMPIAssociationMI* mi;
  const CMPIContext* ctx;
  const CMPIResult* result;
  const CMPIObjectPath* ref;
  const char* assocClass;
  const char* resultClass;
  const char* role;
  const char* resultRole;
  const char** properties;
  bool namesOnly;  // AssociatorNames, ReferenceNames
};

// Hands over every object at the far end of the walk from `call.ref`: instances, or with
// `namesOnly` their paths. All calls share one status of their own, which becomes the
// operation's at the end and on the failure returns.
inline WalkOutcome handOverFarEnd(const Association& association, const TraceSite& site,
                                  const CMPIBroker* mb, const AssociationCall& call) {
  CMPIStatus status = okStatus();
  BlueLightFactory factory(true, association.collectCapabilities);
  // Object managers pass a null association class when the client named none. From one of the
  // ends that can only mean this association.
  CMPIObjectPath* targetPath = factory.get_assoc_targetClass_ObjectPath(
      mb, call.ref, call.assocClass != nullptr ? call.assocClass : association.className,
      call.resultClass, &status);
  if (CMIsNullObject(targetPath)) {
    // Some object managers send a request without an association class to every association
    // provider of the namespace, whatever the source: where this association does not start,
    // the answer is nothing, with success, logged as any operation that found nothing.
    if (call.assocClass == nullptr && !startsAt(association, call.ref)) {
      return {okStatus(), true};
    }
    const char* text =
        call.namesOnly ? association.associatorNamesNoTarget : association.associatorsNoTarget;
    if (text == nullptr) return {okStatus(), false};
    reportFailure(mb, association.component, &status, text, text);
    return {status, false};
  }

  const AssociationEnd* farEnd = association.endOfClass(classNameOf(targetPath, &status));
  if (farEnd == nullptr) return {status, true};
  if (!farEnd->admits(call.resultClass)) return {okStatus(), false};

  if (farEnd->source == EndSource::ComputerSystems) {
    // Every computer system of the namespace, as the broker gives them.
    const bool walked = forEachComputerSystem(
        association, site, mb, call.ctx, targetPath, !call.namesOnly, &status,
        [&](const CMPIData& system) {
          if (call.namesOnly) {
            CMReturnObjectPath(call.result, system.type == CMPI_ref ? system.value.ref : nullptr);
          } else {
            CMReturnInstance(call.result,
                             system.type == CMPI_instance ? system.value.inst : nullptr);
          }
          return true;
        });
    return {status, walked};
  }
  if (call.namesOnly) {
    std::vector<CMPIObjectPath*> paths;
    paths.reserve(factory.getNumberOfInstances());
    if (factoryPaths(factory, farEnd->source, mb, call.ref, paths, &status) != 0) {
      return {status, false};
    }
    walkPaths(paths, [&](CMPIObjectPath* path) {
      CMSetNameSpace(path, nameSpaceCharsOf(call.ref, &status));
      CMReturnObjectPath(call.result, path);
      return true;
    });
    return {status, true};
  }
  std::vector<CMPIInstance*> instances;
  instances.reserve(factory.getNumberOfInstances());
  if (factoryInstances(factory, farEnd->source, mb, call.ref, call.properties, instances,
                       &status) != 0) {
    return {status, false};
  }
  returnInstances(call.result, instances);
  return {status, true};
}

// Associators and AssociatorNames.
inline CMPIStatus associators(const Association& association, const TraceSite& site,
                              const CMPIBroker* mb, const AssociationCall& call) {
  auto parameters = [&call](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " mi=" << call.mi;
    stream << " ctx=" << call.ctx << " result=" << call.result << " ref=" << call.ref
           << " _RefLeftClass=" << call.assocClass << " _RefRightClass=" << call.resultClass
           << " role=" << call.role << " resultRole=" << call.resultRole;
    if (!call.namesOnly) stream << " properties=" << call.properties;
  };
  return tracedWalk(association, site, mb, parameters, parameters,
                    [&] { return handOverFarEnd(association, site, mb, call); });
}

// Hands over the association objects that join `call.ref` to every object at the far end, all
// sharing one association path: instances, or with `namesOnly` their paths. The association
// class is always this one; the client's result class is not passed on.
inline WalkOutcome handOverReferences(const Association& association, const TraceSite& site,
                                      const CMPIBroker* mb, const AssociationCall& call) {
  CMPIStatus status = okStatus();
  BlueLightFactory factory(true, association.collectCapabilities);
  CMPIObjectPath* targetPath = factory.get_assoc_targetClass_ObjectPath(
      mb, call.ref, association.className, nullptr, &status);
  const char* noTarget = call.namesOnly ? "Object Path is NULL in ReferenceNames."
                                        : "Object Path is NULL in References.";
  if (!usableOrReported(association, mb, targetPath, &status, {noTarget, noTarget})) {
    return {status, false};
  }
  const char* targetClass = nullptr;
  if (association.referencesReadTargetClassFirst) targetClass = classNameOf(targetPath, &status);
  CMPIObjectPath* assocPath = newAssociationPath(association, mb, call.ref, &status);
  if (!association.referencesReadTargetClassFirst) targetClass = classNameOf(targetPath, &status);
  const AssociationEnd* farEnd = association.endOfClass(targetClass);
  if (farEnd == nullptr) return {status, true};

  auto handOver = [&](const CMPIObjectPath* other) {
    CMPIInstance* instance = CMNewInstance(mb, assocPath, &status);
    // An instance the broker could not make is handed over as it is, with nothing set on it.
    if (!CMIsNullObject(instance)) {
      const CMPIObjectPath* firstEnd = farEnd == &association.first ? other : call.ref;
      const CMPIObjectPath* secondEnd = farEnd == &association.second ? other : call.ref;
      CMSetProperty(instance, association.first.role, &firstEnd, CMPI_ref);
      CMSetProperty(instance, association.second.role, &secondEnd, CMPI_ref);
    }
    if (!call.namesOnly) {
      CMReturnInstance(call.result, instance);
      return true;
    }
    CMPIObjectPath* name = CMIsNullObject(instance) ? nullptr : CMGetObjectPath(instance, &status);
    if (!CMIsNullObject(name)) CMSetNameSpace(name, nameSpaceCharsOf(call.ref, &status));
    CMReturnObjectPath(call.result, name);
    return true;
  };

  if (farEnd->source == EndSource::ComputerSystems) {
    const bool walked = forEachComputerSystem(
        association, site, mb, call.ctx, targetPath, false, &status, [&](const CMPIData& system) {
          return !namesAnObject(system) || handOver(system.value.ref);
        });
    return {status, walked};
  }
  std::vector<CMPIObjectPath*> others;
  others.reserve(factory.getNumberOfInstances());
  if (factoryPaths(factory, farEnd->source, mb, call.ref, others, &status) != 0) {
    return {status, false};
  }
  walkPaths(others, handOver);
  return {status, true};
}

// References and ReferenceNames.
inline CMPIStatus references(const Association& association, const TraceSite& site,
                             const CMPIBroker* mb, const AssociationCall& call) {
  auto parameters = [&call](const char* propertiesKey) {
    return [&call, propertiesKey](VNLog::VNMessageBuffer& list) {
      std::ostream& stream = list << " mi=" << call.mi;
      stream << " ctx=" << call.ctx << " result=" << call.result << " ref=" << call.ref
             << " resultClass=" << call.resultClass << " role=" << call.role;
      if (!call.namesOnly) stream << propertiesKey << call.properties;
    };
  };
  return tracedWalk(association, site, mb, parameters(" properties="),
                    parameters(association.referencesExitPropertiesKey),
                    [&] { return handOverReferences(association, site, mb, call); });
}

// ---- MI tables -------------------------------------------------------------------------------

// Cleanup of the association MI: nothing to free.
inline CMPIStatus cleanupAssociationMI(CMPIAssociationMI*, const CMPIContext*, CMPIBoolean) {
  return okStatus();
}

// The association MI table of a provider named `miName`.
constexpr CMPIAssociationMIFT associationMIFunctions(
    const char* miName, decltype(CMPIAssociationMIFT::associators) associatorsOperation,
    decltype(CMPIAssociationMIFT::associatorNames) associatorNamesOperation,
    decltype(CMPIAssociationMIFT::references) referencesOperation,
    decltype(CMPIAssociationMIFT::referenceNames) referenceNamesOperation) noexcept {
  return CMPIAssociationMIFT{CMPICurrentVersion,   CMPICurrentVersion,     miName,
                             cleanupAssociationMI, associatorsOperation,   associatorNamesOperation,
                             referencesOperation,  referenceNamesOperation};
}

}  // namespace
}  // namespace BlueLightProvider
}  // namespace Kesta

#endif  // KESTA_ASSOCIATIONFRAME_H
