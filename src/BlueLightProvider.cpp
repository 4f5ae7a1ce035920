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

CMPIStatus BlueLight_Cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
  return okStatus();
}

CMPIStatus BlueLight_EnumInstanceNames(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                       const CMPIResult* result, const CMPIObjectPath* ref) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " ref=" << ref;
  };
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
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " ref=" << ref
         << " properties=" << properties;
  };
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
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " mi=" << mi << " ctx=" << ctx << " result=" << result << " cop=" << cop
         << " properties=" << properties;
  };
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

CMPIStatus BlueLight_CreateInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                    const CMPIObjectPath*, const CMPIInstance*) {
  return notSupportedStatus();
}

CMPIStatus BlueLight_ModifyInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                    const CMPIObjectPath*, const CMPIInstance*, const char**) {
  return notSupportedStatus();
}

CMPIStatus BlueLight_DeleteInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                                    const CMPIObjectPath*) {
  return notSupportedStatus();
}

CMPIStatus BlueLight_ExecQuery(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                               const CMPIObjectPath*, const char*, const char*) {
  return notSupportedStatus();
}

namespace {

CMPIInstanceMIFT instMIFT__ = {
    CMPICurrentVersion,       CMPICurrentVersion,          "instanceBlueLightProfileProvider",
    BlueLight_Cleanup,        BlueLight_EnumInstanceNames, BlueLight_EnumInstances,
    BlueLight_GetInstance,    BlueLight_CreateInstance,    BlueLight_ModifyInstance,
    BlueLight_DeleteInstance, BlueLight_ExecQuery,
};

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
