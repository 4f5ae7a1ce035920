// The instance provider of KESTA_BlueLight: EnumerateInstanceNames, EnumerateInstances and
// GetInstance of the blue lights; everything that would change a light is refused.
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
static const std::string loggerBlueLightProvider("Varnel.BlueLightProvider");

namespace {

constexpr const char* kSourceFile = "BlueLightProvider.cpp";

// The broker handed to the MI factory function; null until it has run. Operations read it once
// and use that value throughout, so a concurrent factory call never changes it under them.
std::atomic<const CMPIBroker*> broker{nullptr};

}  // namespace

CMPIStatus BlueLight_EnumInstanceNames(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                       const CMPIResult* result, const CMPIObjectPath* ref) {
  auto parameters = enumerationParameters(mi, ctx, result, ref);
  KESTA_TRACE_PARA(loggerBlueLightProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  BlueLightFactory factory(true, false);
  std::vector<CMPIObjectPath*> paths;
  paths.reserve(factory.getNumberOfInstances());
  if (factory.getAllBlueLightCMPIObjPaths(mb, ref, paths, &status) != 0) return status;

  const auto count = static_cast<unsigned short>(paths.size());
  for (unsigned short index = 0; index < count; ++index) {
    CMPIObjectPath* path = paths.at(index);
    // The client sees the names in the namespace it asked in.
    CMSetNameSpace(path, nameSpaceOf(ref, &status));
    CMReturnObjectPath(result, path);
  }
  CMReturnDone(result);

  KESTA_TRACE_PARA(loggerBlueLightProvider, kTraceLevel, EXITING, parameters);
  return status;
}

CMPIStatus BlueLight_EnumInstances(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                   const CMPIResult* result, const CMPIObjectPath* ref,
                                   const char** properties) {
  auto parameters = instanceParameters(mi, ctx, result, " ref=", ref, properties);
  KESTA_TRACE_PARA(loggerBlueLightProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return noBrokerStatus();

  BlueLightFactory factory(true, false);
  std::vector<CMPIInstance*> instances;
  instances.reserve(factory.getNumberOfInstances());
  if (factory.getAllBlueLightCMPIInstances(mb, ref, properties, false, instances, &status) != 0) {
    return status;
  }

  returnInstances(result, instances);
  CMReturnDone(result);

  KESTA_TRACE_PARA(loggerBlueLightProvider, kTraceLevel, EXITING, parameters);
  return status;
}

CMPIStatus BlueLight_GetInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                 const CMPIResult* result, const CMPIObjectPath* cop,
                                 const char** properties) {
  auto parameters = instanceParameters(mi, ctx, result, " cop=", cop, properties);
  KESTA_TRACE_PARA(loggerBlueLightProvider, kTraceLevel, ENTERING, parameters);
  CMPIStatus status = okStatus();
  const CMPIBroker* const mb = broker.load();

  if (keyCountOf(cop, &status) == 0) {
    failWithoutKeys(mb, BlueLightProfileProvider, &status);
    CMReturnDone(result);
    KESTA_TRACE_PARA(loggerBlueLightProvider, kTraceLevel, EXITING, parameters);
    return status;
  }
  if (mb == nullptr) return noBrokerStatus();

  CMPIString* deviceID = stringKeyOf(cop, "DeviceID", &status);
  if (deviceID != nullptr) {
    BlueLightFactory factory(true, false);
    std::vector<CMPIInstance*> instances;
    instances.reserve(factory.getNumberOfInstances());
    // An unknown DeviceID ends the operation with the status as it stands and nothing returned.
    if (factory.getOneBlueLightCMPIInstance(mb, cop, deviceID, properties, instances, &status) !=
        0) {
      return status;
    }
    returnInstances(result, instances);
  } else {
    // Without a usable DeviceID the light is chosen by comparing whole object paths.
    BlueLightFactory factory(true, false);
    std::vector<CMPIInstance*> instances;
    instances.reserve(factory.getNumberOfInstances());
    if (factory.getAllBlueLightCMPIInstances(mb, cop, properties, false, instances, &status) != 0) {
      return status;
    }
    returnFirstMatching(result, cop, instances, false, &status);
  }
  CMReturnDone(result);

  KESTA_TRACE_PARA(loggerBlueLightProvider, kTraceLevel, EXITING, parameters);
  return status;
}

namespace {

CMPIInstanceMIFT instMIFT__ =
    instanceMIFunctions("instanceBlueLightProfileProvider", BlueLight_EnumInstanceNames,
                        BlueLight_EnumInstances, BlueLight_GetInstance);

}  // namespace
}  // namespace BlueLightProvider
}  // namespace Kesta

CMPI_EXTERN_C CMPIInstanceMI* BlueLightProfileProvider_Create_InstanceMI(const CMPIBroker* brkr,
                                                                         const CMPIContext* /*ctx*/,
                                                                         CMPIStatus* /*rc*/) {
  static CMPIInstanceMI mi = {nullptr, &Kesta::BlueLightProvider::instMIFT__};
  Kesta::BlueLightProvider::broker.store(brkr);
  return &mi;
}
