// The provider of KESTA_BlueLightElementCapabilities, the association of every blue light
// (ManagedElement) with the one capabilities record (Capabilities): its instances, and the walks
// from one end to the other. Both ends are made by the factory.
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
static const std::string loggerBlueLightElementCapabilitiesProvider(
    "Varnel.BlueLightElementCapabilitiesProvider");

namespace {

constexpr const char* kSourceFile = "BlueLightElementCapabilitiesProvider.cpp";

// The broker handed to the MI factory functions (instance and association share it); null until
// one of them has run. Operations read it once.
std::atomic<const CMPIBroker*> broker{nullptr};

const Association kElementCapabilities = {
    BlueLightElementCapabilitiesClass,
    BlueLightElementCapabilitiesProvider,
    loggerBlueLightElementCapabilitiesProvider,
    kSourceFile,
    /*collectCapabilities=*/true,
    {BlueLightClass, "ManagedElement", EndSource::Lights, nullptr, nullptr},
    {BlueLightCapabilitiesClass, "Capabilities", EndSource::Capabilities, nullptr, nullptr},
    // The filter's key list names the association's generic roles, not the properties that are
    // set; with a property list the references are therefore set only when they are listed.
    {"Antecedent", "Dependent"},
    "Object Path is NULL in Associators.",
    // "AssociatorsNames" is the operation's own long-standing spelling.
    "Object Path is NULL in AssociatorsNames.",
    /*referencesReadTargetClassFirst=*/true,
    /*referencesExitPropertiesKey=*/" properties=",
};

}  // namespace

// One association instance for every (light, capabilities record) pair, in the namespace of
// `ref`. 0 on success; 1 on failure, reported to the broker's trace only.
int bluelightElementCapabilitiesCMPIInstances(const CMPIObjectPath* ref, const char** properties,
                                              std::vector<CMPIInstance*>& instances) {
  const TraceSite site = KESTA_TRACE_SITE;
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " ref=" << ref << " properties=" << properties << " instances=" << &instances;
  };
  const CMPIBroker* const mb = broker.load();
  auto buildEach = [&](BlueLightFactory& factory, CMPIStatus& status) {
    instances.reserve(factory.getNumberOfInstances());
    std::vector<CMPIObjectPath*> lightPaths;
    if (factory.getAllBlueLightCMPIObjPaths(mb, ref, lightPaths, &status) != 0) {
      traceToBroker(mb, kBrokerTraceWarning, BlueLightElementCapabilitiesProvider,
                    "***Can't get BlueLight ObjectPaths.             Exiting "
                    "EnumerateInstanceNames***");
      return false;
    }
    return walkPaths(lightPaths, [&](CMPIObjectPath* lightPath) {
      if (!usableOrReported(kElementCapabilities, mb, lightPath, &status,
                            {"CMPIObjectPath is                 NULL for BlueLight",
                             "CMPIObjectPath is NULL for BlueLight"})) {
        return false;
      }
      CMSetNameSpace(lightPath, nameSpaceCharsOf(ref, &status));

      std::vector<CMPIObjectPath*> capPaths;
      factory.getNumberOfInstances();
      capPaths.reserve(1);
      if (factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb, ref, capPaths, &status) != 0) {
        traceToBroker(mb, kBrokerTraceWarning, BlueLightElementCapabilitiesProvider,
                      "***Can't get ObjectPaths for                 Capabilities                 "
                      "Exiting EnumerateInstanceNames***");
        return false;
      }
      return walkPaths(capPaths, [&](CMPIObjectPath* capPath) {
        // It is the light path that is checked again here, not the capabilities path.
        if (!usableOrReported(kElementCapabilities, mb, lightPath, &status,
                              {"CMPIObjectPath is                     NULL for Capabilities",
                               "CMPIObjectPath is NULL for Capabilities"})) {
          return false;
        }
        CMSetNameSpace(capPath, nameSpaceCharsOf(ref, &status));
        return appendAssociation(kElementCapabilities, mb, ref, properties, lightPath, capPath,
                                 instances, &status,
                                 {"Create CMPIObjectPath failed for ElementCapabilities",
                                  "Create CMPIObjectPath failed for ElementCapabilities."});
      });
    });
  };
  return buildAssociations(kElementCapabilities, site, parameters, buildEach);
}

// The names are made here rather than by the instance builder, and each is handed over as soon as
// it is made.
CMPIStatus BlueLightElementCapabilities_EnumInstanceNames(CMPIInstanceMI* mi,
                                                          const CMPIContext* ctx,
                                                          const CMPIResult* result,
                                                          const CMPIObjectPath* ref) {
  const TraceSite site = KESTA_TRACE_SITE;
  const CMPIBroker* const mb = broker.load();
  auto nameEach = [&](BlueLightFactory& factory, CMPIStatus& status) {
    std::vector<CMPIObjectPath*> lightPaths;
    lightPaths.reserve(factory.getNumberOfInstances());
    if (factory.getAllBlueLightCMPIObjPaths(mb, ref, lightPaths, &status) != 0) return false;
    return walkPaths(lightPaths, [&](CMPIObjectPath* lightPath) {
      if (!usableOrReported(kElementCapabilities, mb, lightPath, &status,
                            {"CMPIObjectPath is NULL for BlueLight class",
                             "CMPIObjectPath is NULL for BlueLight class"})) {
        return false;
      }
      std::vector<CMPIObjectPath*> capPaths;
      capPaths.reserve(1);
      if (factory.getAllBlueLightCapabilitiesCMPIObjPaths(mb, ref, capPaths, &status) != 0) {
        return false;
      }
      return walkPaths(capPaths, [&](CMPIObjectPath* capPath) {
        return usableOrReported(
                   kElementCapabilities, mb, capPath, &status,
                   {"CMPIObjectPath is                     NULL for BlueLightCapabilities",
                    "CMPIObjectPath is NULL for                     Capabilities"}) &&
               returnAssociationName(
                   kElementCapabilities, mb, ref, result, lightPath, capPath, &status,
                   {"Create CMPIObjectPath failed                     for ElementCapabilities",
                    "Create CMPIObjectPath failed                     for ElementCapabilities."});
      });
    });
  };
  return enumerateAssociationNames(kElementCapabilities, site, mb,
                                   {mi, ctx, result, ref, /*properties=*/nullptr}, nameEach);
}

CMPIStatus BlueLightElementCapabilities_EnumInstances(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                                      const CMPIResult* result,
                                                      const CMPIObjectPath* ref,
                                                      const char** properties) {
  return enumerateAssociations(kElementCapabilities, KESTA_TRACE_SITE, broker.load(),
                               {mi, ctx, result, ref, properties},
                               bluelightElementCapabilitiesCMPIInstances);
}

CMPIStatus BlueLightElementCapabilities_GetInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                                    const CMPIResult* result,
                                                    const CMPIObjectPath* cop,
                                                    const char** properties) {
  return getAssociation(kElementCapabilities, KESTA_TRACE_SITE, broker.load(),
                        {mi, ctx, result, cop, properties},
                        bluelightElementCapabilitiesCMPIInstances);
}

CMPIStatus BlueLightElementCapabilities_Associators(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                                    const CMPIResult* result,
                                                    const CMPIObjectPath* ref,
                                                    const char* assocClass, const char* resultClass,
                                                    const char* role, const char* resultRole,
                                                    const char** properties) {
  return associators(kElementCapabilities, KESTA_TRACE_SITE, broker.load(),
                     {mi, ctx, result, ref, assocClass, resultClass, role, resultRole, properties,
                      /*namesOnly=*/false});
}

CMPIStatus BlueLightElementCapabilities_AssociatorNames(
    CMPIAssociationMI* mi, const CMPIContext* ctx, const CMPIResult* result,
    const CMPIObjectPath* ref, const char* assocClass, const char* resultClass, const char* role,
    const char* resultRole) {
  return associators(
      kElementCapabilities, KESTA_TRACE_SITE, broker.load(),
      {mi, ctx, result, ref, assocClass, resultClass, role, resultRole, /*properties=*/nullptr,
       /*namesOnly=*/true});
}

CMPIStatus BlueLightElementCapabilities_References(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                                   const CMPIResult* result,
                                                   const CMPIObjectPath* ref,
                                                   const char* resultClass, const char* role,
                                                   const char** properties) {
  return references(kElementCapabilities, KESTA_TRACE_SITE, broker.load(),
                    {mi, ctx, result, ref, /*assocClass=*/nullptr, resultClass, role,
                     /*resultRole=*/nullptr, properties, /*namesOnly=*/false});
}

CMPIStatus BlueLightElementCapabilities_ReferenceNames(CMPIAssociationMI* mi,
                                                       const CMPIContext* ctx,
                                                       const CMPIResult* result,
                                                       const CMPIObjectPath* ref,
                                                       const char* resultClass, const char* role) {
  return references(
      kElementCapabilities, KESTA_TRACE_SITE, broker.load(),
      {mi, ctx, result, ref, /*assocClass=*/nullptr, resultClass, role, /*resultRole=*/nullptr,
       /*properties=*/nullptr, /*namesOnly=*/true});
}

namespace {

CMPIInstanceMIFT instMIFT__ = instanceMIFunctions(
    "instanceBlueLightElementCapabilitiesProvider", BlueLightElementCapabilities_EnumInstanceNames,
    BlueLightElementCapabilities_EnumInstances, BlueLightElementCapabilities_GetInstance);

CMPIAssociationMIFT assocMIFT__ = associationMIFunctions(
    "associationBlueLightElementCapabilitiesProvider", BlueLightElementCapabilities_Associators,
    BlueLightElementCapabilities_AssociatorNames, BlueLightElementCapabilities_References,
    BlueLightElementCapabilities_ReferenceNames);

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
