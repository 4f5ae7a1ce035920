// The per-operation object factory: collects the lights and/or the capabilities record, files
// them in maps, and turns them into CMPI object paths and instances.
#ifndef KESTA_BLUELIGHTOBJFACTORY_H
#define KESTA_BLUELIGHTOBJFACTORY_H

#include <cmpidt.h>
#include <cmpift.h>

#include <map>
#include <string>
#include <vector>

#include "BlueLight.h"

namespace Kesta {
namespace BlueLightProvider {

// Built on the stack of one CMPI operation and destroyed with it; nothing survives between
// operations. The maps are filled by the constructor and only read afterwards. CMPI objects that
// the factory hands out belong to the broker.
//
// Results of the collecting methods: 0 success; 1 nothing found (the status is left alone);
// 2 a CMPI object could not be created (the status is filled when it is not null).
class BlueLightFactory {
 public:
  // Collects nothing.
  BlueLightFactory();
  // Collects the lights and/or the capabilities record from the instrumentation.
  BlueLightFactory(bool collectLights, bool collectCapabilities);
  ~BlueLightFactory();
  BlueLightFactory(const BlueLightFactory&) = delete;
  BlueLightFactory& operator=(const BlueLightFactory&) = delete;

  // Number of lights in the map, cut to 16 bits like every count of the module.
  unsigned short getNumberOfInstances();

  // Object paths of every light / of the capabilities record, in the namespace of `ref`.
  int getAllBlueLightCMPIObjPaths(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                  std::vector<CMPIObjectPath*>& objectPaths, CMPIStatus* status);
  int getAllBlueLightCapabilitiesCMPIObjPaths(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                              std::vector<CMPIObjectPath*>& objectPaths,
                                              CMPIStatus* status);

  // A KESTA_BlueLight instance of `bluelight`, or null when its path or the instance itself
  // could not be created.
  CMPIInstance* makeBlueLightInstance(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                      BlueLight bluelight, const char** properties, bool isObjPath,
                                      CMPIStatus* status);
  // The light whose DeviceID is `key`: 0 found (one instance appended), 1 not found.
  int getOneBlueLightCMPIInstance(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                  CMPIString* key, const char** properties,
                                  std::vector<CMPIInstance*>& instances, CMPIStatus* status);
  // Every light, in DeviceID order; always 0.
  int getAllBlueLightCMPIInstances(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                   const char** properties, bool isObjPath,
                                   std::vector<CMPIInstance*>& instances, CMPIStatus* status);

  // A KESTA_BlueLightCapabilities instance of `bluelightCapabilities`, or null when its path or
  // the instance could not be created.
  CMPIInstance* makeBlueLightCapabilitiesInstance(const CMPIBroker* broker,
                                                  const CMPIObjectPath* ref,
                                                  BlueLightCapabilities bluelightCapabilities,
                                                  const char** properties, bool isObjPath,
                                                  CMPIStatus* status);
  // Every capabilities record; always 0.
  int getAllBlueLightCapabilitiesCMPIInstances(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                               const char** properties, bool isObjPath,
                                               std::vector<CMPIInstance*>& instances,
                                               CMPIStatus* status);
  // The capabilities record whose InstanceID is `key`: 0 found, 1 not found.
  int getOneBlueLightCapabilitiesCMPIInstance(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                              CMPIString* key, const char** properties,
                                              std::vector<CMPIInstance*>& instances,
                                              CMPIStatus* status);

  // The class at the far end of association `_RefLeftClass` seen from the class of `ref`, or null
  // when the pair is not served. The result is one of the module's class-name constants.
  const char* get_assoc_targetClass_Name(const CMPIBroker* broker, const CMPIObjectPath* ref,
                                         const char* _RefLeftClass, const char* _RefRightClass,
                                         CMPIStatus* status);
  // A key-less object path of that class in the namespace of `ref`, or null.
  CMPIObjectPath* get_assoc_targetClass_ObjectPath(const CMPIBroker* broker,
                                                   const CMPIObjectPath* ref,
                                                   const char* _RefLeftClass,
                                                   const char* _RefRightClass, CMPIStatus* status);

 private:
  // Lets the unit tests look at the collected records and the maps.
  friend struct BlueLightFactoryInspector;

  void _createBlueLightMap();
  void _createCapabilitiesMap();
  // The Caption of the lights in `languageId`. Looked up in the catalogue once per factory and
  // language (a factory lives for one operation), since every light of an operation gets the
  // same text and the lookup touches the file system.
  const std::string& _captionFor(const std::string& languageId);

  std::vector<BlueLight> _blueLights;
  std::vector<BlueLightCapabilities> _blueLightCapabilities;
  std::map<std::string, BlueLight> _blueLightMap;
  std::map<std::string, BlueLightCapabilities> _capabilitiesMap;
  std::string _captionLanguage;  // the language of _caption; empty until the first lookup
  std::string _caption;
};

}  // namespace BlueLightProvider
}  // namespace Kesta

#endif  // KESTA_BLUELIGHTOBJFACTORY_H
