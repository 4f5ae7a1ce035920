// Small pieces of the operation frame that the four provider units share: the statuses they
// return, the operations that do nothing or are refused, the instance MI table, the parameter
// lists of the instance operations, the key checks of GetInstance, and the walk that picks
// instances by object path.
#ifndef KESTA_PROVIDERFRAME_H
#define KESTA_PROVIDERFRAME_H

#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>

#include <vector>

#include "BlueLightNames.h"
#include "BrokerReport.h"
#include "KestaCommon.h"
#include "KestaTrace.h"

namespace Kesta {
namespace BlueLightProvider {
namespace {

inline CMPIStatus okStatus() { return CMPIStatus{CMPI_RC_OK, nullptr}; }

inline CMPIStatus notSupportedStatus() { return CMPIStatus{CMPI_RC_ERR_NOT_SUPPORTED, nullptr}; }

// An operation called before its MI factory function ran has no broker to create anything
// with, nor a message text; it fails plainly instead of crashing in the first broker call.
inline CMPIStatus noBrokerStatus() { return CMPIStatus{CMPI_RC_ERR_FAILED, nullptr}; }

// The module keeps nothing that cleanup could free, and it is read-only: what would create,
// change, delete or query instances is refused alike by every provider.
inline CMPIStatus cleanupInstanceMI(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
  return okStatus();
}
inline CMPIStatus refuseCreateInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                       const CMPIObjectPath*, const CMPIInstance*) {
  return notSupportedStatus();
}
inline CMPIStatus refuseModifyInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                       const CMPIObjectPath*, const CMPIInstance*, const char**) {
  return notSupportedStatus();
}
inline CMPIStatus refuseDeleteInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                       const CMPIObjectPath*) {
  return notSupportedStatus();
}
inline CMPIStatus refuseExecQuery(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                  const CMPIObjectPath*, const char*, const char*) {
  return notSupportedStatus();
}

// The instance MI table of a provider named `miName` that serves the three read operations.
constexpr CMPIInstanceMIFT instanceMIFunctions(
    const char* miName, decltype(CMPIInstanceMIFT::enumerateInstanceNames) enumerateInstanceNames,
    decltype(CMPIInstanceMIFT::enumerateInstances) enumerateInstances,
    decltype(CMPIInstanceMIFT::getInstance) getInstance) noexcept {
  return CMPIInstanceMIFT{CMPICurrentVersion,   CMPICurrentVersion,     miName,
                          cleanupInstanceMI,    enumerateInstanceNames, enumerateInstances,
                          getInstance,          refuseCreateInstance,   refuseModifyInstance,
                          refuseDeleteInstance, refuseExecQuery};
}

// The parameter list of EnumInstanceNames.
inline auto enumerationParameters(const CMPIInstanceMI* mi, const CMPIContext* ctx,
                                  const CMPIResult* result, const CMPIObjectPath* ref) {
  return [=](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " ref=" << ref;
  };
}

// The parameter list of EnumInstances (`pathKey` " ref=") and GetInstance (" cop=").
inline auto instanceParameters(const CMPIInstanceMI* mi, const CMPIContext* ctx,
                               const CMPIResult* result, const char* pathKey,
                               const CMPIObjectPath* path, const char** properties) {
  return [=](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << pathKey << path
         << " properties=" << properties;
  };
}

// The number of keys of `path`; a missing path has none.
inline CMPICount keyCountOf(const CMPIObjectPath* path, CMPIStatus* status) {
  if (CMIsNullObject(path)) return 0;
  return CMGetKeyCount(path, status);
}

// The failure of a GetInstance whose object path carries no key.
inline void failWithoutKeys(const CMPIBroker* broker, const char* component, CMPIStatus* status) {
  const char* const text = "At least one key should be passed";
  reportFailure(broker, component, status, text, text);
}

// Hands every instance to the result as it is, null entries included.
inline void returnInstances(const CMPIResult* result, const std::vector<CMPIInstance*>& instances) {
  const auto count = static_cast<unsigned short>(instances.size());
  for (unsigned short index = 0; index < count; ++index) {
    CMReturnInstance(result, instances.at(index));
  }
}

// The string value of key `name` of `path`, or null when the key is missing, is not a string, or
// its string has no handle. A key of another type is never read as a string.
inline CMPIString* stringKeyOf(const CMPIObjectPath* path, const char* name, CMPIStatus* status) {
  if (CMIsNullObject(path)) return nullptr;
  CMPIData key = CMGetKey(path, name, status);
  if (key.type != CMPI_string || CMIsNullObject(key.value.string)) return nullptr;
  return key.value.string;
}

// Hands over the instances whose object path names the same instance as `cop`, skipping null
// entries; with `firstOnly` the walk stops at the first match.
inline void returnMatching(const CMPIResult* result, const CMPIObjectPath* cop,
                           std::vector<CMPIInstance*>& instances, bool compareNamespaces,
                           bool firstOnly, CMPIStatus* status) {
  const auto count = static_cast<unsigned short>(instances.size());
  for (unsigned short index = 0; index < count; ++index) {
    CMPIInstance* instance = instances.at(index);
    if (CMIsNullObject(instance)) continue;
    CMPIObjectPath* path = CMGetObjectPath(instance, status);
    if (Kesta::isObjPathsEqual(cop, path, compareNamespaces)) {
      CMReturnInstance(result, instance);
      if (firstOnly) return;
    }
  }
}

// Hands over the first instance whose object path names the same instance as `cop`.
inline void returnFirstMatching(const CMPIResult* result, const CMPIObjectPath* cop,
                                std::vector<CMPIInstance*>& instances, bool compareNamespaces,
                                CMPIStatus* status) {
  returnMatching(result, cop, instances, compareNamespaces, true, status);
}

}  // namespace
}  // namespace BlueLightProvider
}  // namespace Kesta

#endif  // KESTA_PROVIDERFRAME_H
