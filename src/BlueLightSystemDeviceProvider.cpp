// The provider of KESTA_BlueLightSystemDevice, the association of every computer system that the
// object manager knows (GroupComponent) with every blue light (PartComponent). The computer
// systems come from another provider, through the broker's up-calls.
#include <atomic>
#include <string>
#include <vector>

#include "AssociationFrame.h"
#include "BlueLightNames.h"
#include "BlueLightObjFactory.h"
#include "BrokerReport.h"
#include "KestaTrace.h"
#include "ProviderFrame.h"

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

const Association kSystemDevice = {
    BlueLightSystemDeviceClass,
    BlueLightSystemDeviceProvider,
    loggerBlueLightSystemDeviceProvider,
    kSourceFile,
    /*collectCapabilities=*/false,
    {ComputerSystemClass, "GroupComponent", EndSource::ComputerSystems, "KESTA_ComputerSystem",
     "CIM_ComputerSystem"},
    {BlueLightClass, "PartComponent", EndSource::Lights, "KESTA_BlueLight", "CIM_AlarmDevice"},
    {"GroupComponent", "PartComponent"},
    // A walk from a path whose far end is not known ends silently, with success.
    /*associatorsNoTarget=*/nullptr,
    /*associatorNamesNoTarget=*/nullptr,
    /*referencesReadTargetClassFirst=*/false,
    // The exit line of References has always spelt this key with a run of blanks inside it.
    /*referencesExitPropertiesKey=*/" p     roperties=",
};

// The class path with which the computer systems are asked for, in the namespace of `ref`; null,
// reported with `failure`, when the broker could not make it.
CMPIObjectPath* computerSystemsPath(const CMPIBroker* mb, const CMPIObjectPath* ref,
                                    CMPIStatus* status, const FailureTexts& failure) {
  CMPIObjectPath* path =
      CMNewObjectPath(mb, nameSpaceCharsOf(ref, status), ComputerSystemClass, status);
  return usableOrReported(kSystemDevice, mb, path, status, failure) ? path : nullptr;
}

}  // namespace

// One association instance for every (computer system, light) pair, in the namespace of `ref`.
// 0 on success; 1 on failure, reported to the broker's trace and the log only.
int bluelightSystemDeviceCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                       const CMPIContext* ctx,
                                       std::vector<CMPIInstance*>& instances) {
  const TraceSite site = KESTA_TRACE_SITE;
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " ref=" << ref << " properties=" << properties << " ctx=" << ctx
         << " instances=" << &instances;
  };
  const CMPIBroker* const mb = broker.load();
  auto buildEach = [&](BlueLightFactory& factory, CMPIStatus& status) {
    CMPIObjectPath* systemsPath =
        computerSystemsPath(mb, ref, &status,
                            {"Create CMPIObjectPath            failed.",
                             "Create CMPIObjectPath failed for             ComputerSystemClass."});
    if (systemsPath == nullptr) return false;
    return forEachComputerSystem(
        kSystemDevice, site, mb, ctx, systemsPath, false, &status, [&](const CMPIData& system) {
          if (!namesAnObject(system)) return true;
          std::vector<CMPIObjectPath*> lightPaths;
          lightPaths.reserve(factory.getNumberOfInstances());
          if (factory.getAllBlueLightCMPIObjPaths(mb, ref, lightPaths, &status) != 0) {
            return false;
          }
          return walkPaths(lightPaths, [&](CMPIObjectPath* lightPath) {
            const char* const nullText = "CMPIObjectPath is NULL for BlueLight Provider";
            if (!usableOrReported(kSystemDevice, mb, lightPath, &status, {nullText, nullText})) {
              return false;
            }
            CMSetNameSpace(lightPath, nameSpaceCharsOf(ref, &status));
            // A pair without an association path is reported and the enumeration goes on:
            // that light gets no instance for this computer system.
            appendAssociation(
                kSystemDevice, mb, ref, properties, system.value.ref, lightPath, instances, &status,
                {"Create CMPIObjectPath failed for HostedAccessPoint",
                 "Create CMPIObjectPath failed for                     HostedAccessPoint."});
            return true;
          });
        });
  };
  return buildAssociations(kSystemDevice, site, parameters, buildEach);
}

CMPIStatus BlueLightSystemDevice_EnumInstanceNames(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                                   const CMPIResult* result,
                                                   const CMPIObjectPath* ref) {
  const TraceSite site = KESTA_TRACE_SITE;
  const CMPIBroker* const mb = broker.load();
  auto nameEach = [&](BlueLightFactory& factory, CMPIStatus& status) {
    CMPIObjectPath* systemsPath = computerSystemsPath(
        mb, ref, &status,
        {"Create CMPIObjectPath failed.", "Create CMPIObjectPath failed for ComputerSystemClass."});
    if (systemsPath == nullptr) return false;
    // One vector for all computer systems: the factory appends to it, so the k-th computer
    // system is paired with the lights k times over. Kept as the operation has always answered.
    std::vector<CMPIObjectPath*> lightPaths;
    lightPaths.reserve(factory.getNumberOfInstances());
    return forEachComputerSystem(
        kSystemDevice, site, mb, ctx, systemsPath, false, &status, [&](const CMPIData& system) {
          if (!namesAnObject(system)) return true;
          if (factory.getAllBlueLightCMPIObjPaths(mb, ref, lightPaths, &status) != 0) {
            return false;
          }
          return walkPaths(lightPaths, [&](CMPIObjectPath* lightPath) {
            if (!usableOrReported(kSystemDevice, mb, lightPath, &status,
                                  {"CMPIObjectPath is NULL for BlueLight",
                                   "CMPIObjectPath is NULL for BlueLight Class"})) {
              return false;
            }
            CMSetNameSpace(lightPath, nameSpaceCharsOf(ref, &status));
            return returnAssociationName(kSystemDevice, mb, ref, result, system.value.ref,
                                         lightPath, &status,
                                         {"Create CMPIObjectPath failed                     for "
                                          "BlueLightSystemDeviceProvider.",
                                          "Create CMPIObjectPath failed for                     "
                                          "BlueLightSystemDeviceClass."});
          });
        });
  };
  return enumerateAssociationNames(kSystemDevice, site, mb,
                                   {mi, ctx, result, ref, /*properties=*/nullptr}, nameEach);
}

namespace {

// The instance builder as the frame calls it, with the operation's context for the up-call.
auto builderWith(const CMPIContext* ctx) {
  return [ctx](const CMPIObjectPath* path, const char** properties,
               std::vector<CMPIInstance*>& instances) {
    return bluelightSystemDeviceCMPIInstances(path, properties, ctx, instances);
  };
}

}  // namespace

CMPIStatus BlueLightSystemDevice_EnumInstances(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                               const CMPIResult* result, const CMPIObjectPath* ref,
                                               const char** properties) {
  return enumerateAssociations(kSystemDevice, KESTA_TRACE_SITE, broker.load(),
                               {mi, ctx, result, ref, properties}, builderWith(ctx));
}

CMPIStatus BlueLightSystemDevice_GetInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                             const CMPIResult* result, const CMPIObjectPath* cop,
                                             const char** properties) {
  return getAssociation(kSystemDevice, KESTA_TRACE_SITE, broker.load(),
                        {mi, ctx, result, cop, properties}, builderWith(ctx));
}

CMPIStatus BlueLightSystemDevice_Associators(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                             const CMPIResult* result, const CMPIObjectPath* ref,
                                             const char* assocClass, const char* resultClass,
                                             const char* role, const char* resultRole,
                                             const char** properties) {
  return associators(kSystemDevice, KESTA_TRACE_SITE, broker.load(),
                     {mi, ctx, result, ref, assocClass, resultClass, role, resultRole, properties,
                      /*namesOnly=*/false});
}

CMPIStatus BlueLightSystemDevice_AssociatorNames(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                                 const CMPIResult* result,
                                                 const CMPIObjectPath* ref, const char* assocClass,
                                                 const char* resultClass, const char* role,
                                                 const char* resultRole) {
  return associators(
      kSystemDevice, KESTA_TRACE_SITE, broker.load(),
      {mi, ctx, result, ref, assocClass, resultClass, role, resultRole, /*properties=*/nullptr,
       /*namesOnly=*/true});
}

CMPIStatus BlueLightSystemDevice_References(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                            const CMPIResult* result, const CMPIObjectPath* ref,
                                            const char* resultClass, const char* role,
                                            const char** properties) {
  return references(kSystemDevice, KESTA_TRACE_SITE, broker.load(),
                    {mi, ctx, result, ref, /*assocClass=*/nullptr, resultClass, role,
                     /*resultRole=*/nullptr, properties, /*namesOnly=*/false});
}

CMPIStatus BlueLightSystemDevice_ReferenceNames(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                                const CMPIResult* result, const CMPIObjectPath* ref,
                                                const char* resultClass, const char* role) {
  return references(
      kSystemDevice, KESTA_TRACE_SITE, broker.load(),
      {mi, ctx, result, ref, /*assocClass=*/nullptr, resultClass, role, /*resultRole=*/nullptr,
       /*properties=*/nullptr, /*namesOnly=*/true});
}

namespace {

CMPIInstanceMIFT instMIFT__ = instanceMIFunctions(
    "instanceBlueLightSystemDeviceProvider", BlueLightSystemDevice_EnumInstanceNames,
    BlueLightSystemDevice_EnumInstances, BlueLightSystemDevice_GetInstance);

CMPIAssociationMIFT assocMIFT__ =
    associationMIFunctions("associationBlueLightSystemDeviceProvider",
                           BlueLightSystemDevice_Associators, BlueLightSystemDevice_AssociatorNames,
                           BlueLightSystemDevice_References, BlueLightSystemDevice_ReferenceNames);

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
