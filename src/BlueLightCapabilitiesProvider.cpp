// The instance provider of KESTA_BlueLightCapabilities: the one capabilities record of the lights,
// enumerated and got; everything that would change it is refused.
#include <atomic>
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
static const std::string loggerBlueLightCapabilitiesProvider(
    "Varnel.BlueLightCapabilitiesProvider");

namespace {

constexpr const char* kSourceFile = "BlueLightCapabilitiesProvider.cpp";

// The broker handed to the MI factory function; null until it has run. Operations read it once.
std::atomic<const CMPIBroker*> broker{nullptr};

}  // namespace

CMPIStatus BlueLightCapabilities_EnumInstanceNames(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                                   const CMPIResult* result,
                                                   const CMPIObjectPath* ref) {
  auto parameters = enumerationParameters(mi, ctx, result, ref);
  KESTA_TRACE_PARA(loggerBlueLightCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  BlueLightFactory factory(false, true);
  std::vector<CMPIObjectPath*> paths;
  if (factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb, ref, paths, &status) != 0) {
    return status;
  }

  const auto count = static_cast<unsigned short>(paths.size());
  for (unsigned short index = 0; index < count; ++index) {
    CMPIObjectPath* path = paths.at(index);
    if (CMIsNullObject(path)) continue;
    CMSetNameSpace(path, nameSpaceOf(ref, &status));
    CMReturnObjectPath(result, path);
  }
  CMReturnDone(result);

  KESTA_TRACE_PARA(loggerBlueLightCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  return status;
}

CMPIStatus BlueLightCapabilities_EnumInstances(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                               const CMPIResult* result, const CMPIObjectPath* ref,
                                               const char** properties) {
  auto parameters = instanceParameters(mi, ctx, result, " ref=", ref, properties);
  KESTA_TRACE_PARA(loggerBlueLightCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  BlueLightFactory factory(false, true);
  std::vector<CMPIInstance*> instances;
  if (factory.getAllBlueLightCapabilitiesCMPIInstances(mb, ref, properties, false, instances,
                                                       &status) != 0) {
    return status;
  }
  // Handed over as built, a null entry included.
  returnInstances(result, instances);
  CMReturnDone(result);

  KESTA_TRACE_PARA(loggerBlueLightCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  return status;
}

CMPIStatus BlueLightCapabilities_GetInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                             const CMPIResult* result, const CMPIObjectPath* cop,
                                             const char** properties) {
  auto parameters = instanceParameters(mi, ctx, result, " cop=", cop, properties);
  KESTA_TRACE_PARA(loggerBlueLightCapabilitiesProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();

  if (keyCountOf(cop, &status) == 0) {
    failWithoutKeys(mb, BlueLightCapabilitiesProvider, &status);
  } else {
    if (mb == nullptr) return noBrokerStatus();
    std::vector<CMPIInstance*> instances;
    CMPIString* instanceID = stringKeyOf(cop, "InstanceID", &status);
    if (instanceID != nullptr) {
      BlueLightFactory factory(false, true);
      // An unknown InstanceID ends the operation with the status as it stands and no result.
      if (factory.getOneBlueLightCapabilitiesCMPIInstance(mb, cop, instanceID, properties,
                                                          instances, &status) != 0) {
        return status;
      }
      returnInstances(result, instances);
    } else {
      // Without a usable InstanceID the record is looked for by its whole object path. This
      // factory collects the lights, not the capabilities, so nothing is ever found here; the
      // operation has always answered so and keeps doing it.
      BlueLightFactory factory(true, false);
      if (factory.getAllBlueLightCapabilitiesCMPIInstances(mb, cop, properties, false, instances,
                                                           &status) != 0) {
        return status;
      }
      returnMatching(result, cop, instances, false, false, &status);
    }
  }
  CMReturnDone(result);

  KESTA_TRACE_PARA(loggerBlueLightCapabilitiesProvider, kTraceLevel, EXITING, parameters);
  return status;
}

namespace {

CMPIInstanceMIFT instMIFT__ = instanceMIFunctions(
    "instanceBlueLightCapabilitiesProvider", BlueLightCapabilities_EnumInstanceNames,
    BlueLightCapabilities_EnumInstances, BlueLightCapabilities_GetInstance);

}  // namespace
}  // namespace BlueLightProvider
}  // namespace Kesta

CMPI_EXTERN_C CMPIInstanceMI* BlueLightCapabilitiesProvider_Create_InstanceMI(
    const CMPIBroker* brkr, const CMPIContext* /*ctx*/, CMPIStatus* /*rc*/) {
  static CMPIInstanceMI mi = {nullptr, &Kesta::BlueLightProvider::instMIFT__};
  Kesta::BlueLightProvider::broker.store(brkr);
  return &mi;
}
