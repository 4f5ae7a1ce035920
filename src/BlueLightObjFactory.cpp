// The object factory: collection into maps, object paths, instances of lights and of the
// capabilities record, and the far end of an association.
#include "BlueLightObjFactory.h"

#include <cstring>
#include <map>
#include <string>
#include <vector>

#include "BlueLight.h"
#include "BlueLightNames.h"
#include "BrokerReport.h"
#include "KestaCommon.h"
#include "KestaLocale.h"
#include "KestaTrace.h"

namespace Kesta {
namespace BlueLightProvider {

// Logger category of this unit.
static const std::string loggerBlueLightObjFactory("Varnel.BlueLightObjFactory");

namespace {

constexpr const char* kSourceFile = "BlueLightObjFactory.cpp";

// The names of a property list (up to its first null entry), each mapped to itself.
std::map<std::string, std::string> requestedPropertiesOf(const char** properties) {
  std::map<std::string, std::string> requested;
  if (properties == nullptr) return requested;
  for (unsigned short index = 0; properties[index] != nullptr; ++index) {
    requested[properties[index]] = properties[index];
    if (index == 0xFFFF) break;  // the 16-bit counter would wrap onto the first entry again
  }
  return requested;
}

// The object path of a new instance, in the namespace of `ref` and with this system as host.
// Null (or a path without a handle) when the broker could not make it.
CMPIObjectPath* newClassPath(const CMPIBroker* broker, const CMPIObjectPath* ref,
                             const char* className, CMPIStatus* nameSpaceStatus,
                             CMPIStatus* creationStatus, const std::string& systemName) {
  const char* nameSpace = nameSpaceOf(ref, nameSpaceStatus);
  CMPIObjectPath* path = CMNewObjectPath(broker, nameSpace, className, creationStatus);
  if (!isUsable(path)) return path;
  CMSetNameSpace(path, nameSpaceOf(ref, nameSpaceStatus));
  CMSetHostname(path, systemName.c_str());
  return path;
}

CMPIObjectPath* newClassPath(const CMPIBroker* broker, const CMPIObjectPath* ref,
                             const char* className, CMPIStatus* nameSpaceStatus,
                             CMPIStatus* creationStatus) {
  return newClassPath(broker, ref, className, nameSpaceStatus, creationStatus,
                      Kesta::getSystemName());
}

// A CMPI array of 16-bit values; null when the broker could not make it.
CMPIArray* newUint16Array(const CMPIBroker* broker, const std::vector<unsigned short>& values,
                          CMPIStatus* status) {
  const auto count = static_cast<unsigned short>(values.size());
  CMPIArray* array = CMNewArray(broker, count, CMPI_uint16, status);
  if (array == nullptr) return nullptr;
  for (unsigned short index = 0; index < count; ++index) {
    CMPIUint16 value = values.at(index);
    CMSetArrayElementAt(array, index, &value, CMPI_uint16);
  }
  return array;
}

}  // namespace

// ---------------------------------------------------------------------------------------------
// Construction and maps
// ---------------------------------------------------------------------------------------------

BlueLightFactory::BlueLightFactory() = default;

BlueLightFactory::BlueLightFactory(bool collectLights, bool collectCapabilities) {
  if (collectLights) {
    // A failed collection leaves the map empty; the enumerations then report that there is
    // nothing, each in its own way.
    if (static_cast<unsigned short>(getBlueLightInstances(_blueLights)) == 0) {
      _createBlueLightMap();
    }
  }
  if (collectCapabilities) {
    if (static_cast<unsigned short>(getBlueLightCapabilitiesInstances(_blueLightCapabilities)) ==
        0) {
      _createCapabilitiesMap();
    }
  }
}

BlueLightFactory::~BlueLightFactory() = default;

void BlueLightFactory::_createBlueLightMap() {
  // Counts are 16-bit throughout the module: with more lights than that, only the remainder is
  // filed.
  const auto count = static_cast<unsigned short>(_blueLights.size());
  for (unsigned short index = 0; index < count; ++index) {
    const BlueLight& light = _blueLights.at(index);
    // Lights with the same stripped DeviceID share one entry; the later one wins.
    _blueLightMap[light.getDeviceID()] = light;
  }
}

void BlueLightFactory::_createCapabilitiesMap() {
  const auto count = static_cast<unsigned short>(_blueLightCapabilities.size());
  for (unsigned short index = 0; index < count; ++index) {
    BlueLightCapabilities record = _blueLightCapabilities.at(index);
    const std::string key = record.getInstanceID();
    _capabilitiesMap[key] = record;
  }
}

const std::string& BlueLightFactory::_captionFor(const std::string& languageId) {
  if (_captionLanguage.empty() || _captionLanguage != languageId) {
    // The lookup finds some text in every case (the platform falls back to English), so the
    // result is used as it comes.
    const std::wstring messageId = L"MSGID_ALARMDEVICE_CAPTION";
    const std::wstring resourceLibrary =
        Kesta::Locale::getResourceLibrary(Kesta::Locale::kResourceKindMessages, languageId);
    _caption = Kesta::make_string(Kesta::ResourceString(resourceLibrary, messageId).str());
    _captionLanguage = languageId;
  }
  return _caption;
}

unsigned short BlueLightFactory::getNumberOfInstances() {
  return static_cast<unsigned short>(_blueLightMap.size());
}

// ---------------------------------------------------------------------------------------------
// Object paths
// ---------------------------------------------------------------------------------------------

namespace {

// What the object paths of one kind of record differ in.
struct PathKind {
  const char* className;
  const char* component;          // the provider that the broker's trace names
  int emptyTraceLevel;            // of the trace that there is no record at all
  const char* failureStatusText;  // when the broker makes no path
  const char* failureTraceText;
};

// The two kinds have always been reported with these differences (the level of the empty trace,
// the full stop, "RecordLogClass", the runs of blanks); they are kept as they stand.
const PathKind kLightPaths = {
    BlueLightClass, BlueLightProfileProvider, kBrokerTraceInfo, "Create CMPIObjectPath failed.",
    "Create CMPIObjectPath                     failed for RecordLogClass."};
const PathKind kCapabilitiesPaths = {
    BlueLightCapabilitiesClass, BlueLightCapabilitiesProvider, kBrokerTraceWarning,
    "Create CMPIObjectPath failed",
    "Create CMPIObjectPath failed for                     BlueLightCapabilities class"};

// The keys of a light's path: its own class, its DeviceID and the system it belongs to.
void addKeys(CMPIObjectPath* path, const BlueLight& light, const std::string& systemName) {
  CMAddKey(path, "CreationClassName", BlueLightClass, CMPI_chars);
  CMAddKey(path, "DeviceID", light.getDeviceID().c_str(), CMPI_chars);
  CMAddKey(path, "SystemCreationClassName", ComputerSystemClass, CMPI_chars);
  CMAddKey(path, "SystemName", systemName.c_str(), CMPI_chars);
}

// The one key of the capabilities record's path.
void addKeys(CMPIObjectPath* path, BlueLightCapabilities record,
             const std::string& /*systemName*/) {
  CMAddKey(path, "InstanceID", record.getInstanceID().c_str(), CMPI_chars);
}

// Appends the object path of every record of `records`, in key order, for the public method
// named by `site`: 0 success, 1 no record, 2 the broker made no path (paths made before stay).
template <typename Record>
int appendObjectPaths(const TraceSite& site, const std::map<std::string, Record>& records,
                      const PathKind& kind, const CMPIBroker* broker, const CMPIObjectPath* ref,
                      std::vector<CMPIObjectPath*>& objectPaths, CMPIStatus* status) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " broker=" << broker << " ref=" << ref << " objectPaths=" << &objectPaths
         << " status=" << status;
  };
  emitTracePara(site, kSourceFile, loggerBlueLightObjFactory, kTraceLevel, ENTERING, parameters);

  if (records.empty()) {
    traceToBroker(broker, kind.emptyTraceLevel, kind.component, "***No instance found***");
    return 1;
  }

  for (const auto& entry : records) {
    CMPIObjectPath* path =
        CMNewObjectPath(broker, nameSpaceOf(ref, status), kind.className, status);
    if (!isUsable(path)) {
      reportFailure(broker, kind.component, status, kind.failureStatusText, kind.failureTraceText);
      return 2;
    }
    // One system name for the host and the key that names the system.
    const std::string systemName = Kesta::getSystemName();
    CMSetNameSpace(path, nameSpaceOf(ref, status));
    CMSetHostname(path, systemName.c_str());
    addKeys(path, entry.second, systemName);
    objectPaths.push_back(path);
  }

  emitTracePara(site, kSourceFile, loggerBlueLightObjFactory, kTraceLevel, EXITING, parameters);
  return 0;
}

}  // namespace

int BlueLightFactory::getAllBlueLightCMPIObjPaths(const CMPIBroker* broker,
                                                  const CMPIObjectPath* ref,
                                                  std::vector<CMPIObjectPath*>& objectPaths,
                                                  CMPIStatus* status) {
  return appendObjectPaths(KESTA_TRACE_SITE, _blueLightMap, kLightPaths, broker, ref, objectPaths,
                           status);
}

int BlueLightFactory::getAllBlueLightCapabilitiesCMPIObjPaths(
    const CMPIBroker* broker, const CMPIObjectPath* ref, std::vector<CMPIObjectPath*>& objectPaths,
    CMPIStatus* status) {
  return appendObjectPaths(KESTA_TRACE_SITE, _capabilitiesMap, kCapabilitiesPaths, broker, ref,
                           objectPaths, status);
}

// ---------------------------------------------------------------------------------------------
// Light instances
// ---------------------------------------------------------------------------------------------

CMPIInstance* BlueLightFactory::makeBlueLightInstance(const CMPIBroker* broker,
                                                      const CMPIObjectPath* ref,
                                                      BlueLight bluelight, const char** properties,
                                                      bool isObjPath, CMPIStatus* status) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " broker=" << broker << " ref=" << ref << " bluelight=" << &bluelight
         << " properties=" << properties << " isObjPath=" << isObjPath << " rc=" << status;
  };
  KESTA_TRACE_PARA(loggerBlueLightObjFactory, kTraceLevel, ENTERING, parameters);

  const std::map<std::string, std::string> requestedProperties = requestedPropertiesOf(properties);
  const bool setAllProperties = properties == nullptr && !isObjPath;
  const char* keyList[] = {"CreationClassName", "DeviceID", "SystemCreationClassName", "SystemName",
                           nullptr};
  auto wanted = [&](const char* name) {
    return setAllProperties || requestedProperties.count(std::string(name)) != 0;
  };

  // One system name for the path and the key property, as they must agree.
  const std::string systemName = Kesta::getSystemName();
  CMPIInstance* instance = nullptr;
  CMPIObjectPath* path = newClassPath(broker, ref, BlueLightClass, status, nullptr, systemName);
  if (isUsable(path)) {
    instance = CMNewInstance(broker, path, nullptr);
    if (!isUsable(instance)) instance = nullptr;
  }
  if (instance == nullptr) {
    KESTA_TRACE_PARA(loggerBlueLightObjFactory, kTraceLevel, EXITING, parameters);
    return nullptr;
  }

  CMSetPropertyFilter(instance, properties, keyList);
  CMSetProperty(instance, "CreationClassName", BlueLightClass, CMPI_chars);
  CMSetProperty(instance, "DeviceID", bluelight.getDeviceID().c_str(), CMPI_chars);
  CMSetProperty(instance, "SystemCreationClassName", ComputerSystemClass, CMPI_chars);
  CMSetProperty(instance, "SystemName", systemName.c_str(), CMPI_chars);

  if (wanted("Caption")) {
    const std::string& caption = _captionFor(Kesta::Locale::getLanguageId());
    CMSetProperty(instance, "Caption", caption.c_str(), CMPI_chars);
  }
  // Description, Name and ElementName all carry the stripped element name.
  const bool wantDescription = wanted("Description");
  const bool wantName = wanted("Name");
  const bool wantElementName = wanted("ElementName");
  if (wantDescription || wantName || wantElementName) {
    const std::string elementName = bluelight.getElementName();
    if (wantDescription) CMSetProperty(instance, "Description", elementName.c_str(), CMPI_chars);
    if (wantName) CMSetProperty(instance, "Name", elementName.c_str(), CMPI_chars);
    if (wantElementName) CMSetProperty(instance, "ElementName", elementName.c_str(), CMPI_chars);
  }
  if (wanted("RequestedState")) {
    CMPIUint16 value = bluelight.getRequestedState();
    CMSetProperty(instance, "RequestedState", &value, CMPI_uint16);
  }
  if (wanted("HealthState")) {
    CMPIUint16 value = bluelight.getHealthState();
    CMSetProperty(instance, "HealthState", &value, CMPI_uint16);
  }
  if (wanted("OperationalStatus")) {
    CMPIArray* array = newUint16Array(broker, bluelight.getOperationalStatus(), status);
    if (array == nullptr) {
      // The partly built instance is still handed out; the exit line is left out on purpose.
      reportFailure(broker, BlueLightProfileProvider, status,
                    "Create Array for Property                         OperationalStatus failed.",
                    "Create Array for Property Operat                        ionalStatus failed.");
      return instance;
    }
    CMSetProperty(instance, "OperationalStatus", &array, CMPI_uint16A);
  }
  if (wanted("AudibleAlarm")) {
    CMPIBoolean value = bluelight.getAudibleAlarm() ? 1 : 0;
    CMSetProperty(instance, "AudibleAlarm", &value, CMPI_boolean);
  }
  if (wanted("VisibleAlarm")) {
    CMPIBoolean value = bluelight.getVisibleAlarm() ? 1 : 0;
    CMSetProperty(instance, "VisibleAlarm", &value, CMPI_boolean);
  }
  if (wanted("MotionAlarm")) {
    CMPIBoolean value = bluelight.getMotionAlarm() ? 1 : 0;
    CMSetProperty(instance, "MotionAlarm", &value, CMPI_boolean);
  }
  if (wanted("AlarmState")) {
    CMPIUint16 value = bluelight.getAlarmState();
    CMSetProperty(instance, "AlarmState", &value, CMPI_uint16);
  }

  KESTA_TRACE_PARA(loggerBlueLightObjFactory, kTraceLevel, EXITING, parameters);
  return instance;
}

// ---------------------------------------------------------------------------------------------
// Capabilities instances
// ---------------------------------------------------------------------------------------------

CMPIInstance* BlueLightFactory::makeBlueLightCapabilitiesInstance(
    const CMPIBroker* broker, const CMPIObjectPath* ref,
    BlueLightCapabilities bluelightCapabilities, const char** properties, bool isObjPath,
    CMPIStatus* status) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " broker=" << broker << " ref=" << ref << " bluelightCap=" << &bluelightCapabilities
         << " properties=" << properties << " IsObjPath=" << isObjPath << " rc=" << status;
  };
  KESTA_TRACE_PARA(loggerBlueLightObjFactory, kTraceLevel, ENTERING, parameters);

  const std::map<std::string, std::string> requestedProperties = requestedPropertiesOf(properties);
  const bool setAllProperties = properties == nullptr && !isObjPath;
  const char* keyList[] = {"InstanceID", nullptr};

  CMPIInstance* result = nullptr;
  CMPIObjectPath* path = newClassPath(broker, ref, BlueLightCapabilitiesClass, status, status);
  if (isUsable(path)) {
    CMPIInstance* instance = CMNewInstance(broker, path, nullptr);
    // An instance without a handle is handed back as it is, with nothing set on it.
    result = instance;
    if (isUsable(instance)) {
      CMSetPropertyFilter(instance, properties, keyList);
      CMSetProperty(instance, "InstanceID", bluelightCapabilities.getInstanceID().c_str(),
                    CMPI_chars);
      if (setAllProperties || requestedProperties.count("RequestedAlarmStatesSupported") != 0) {
        CMPIArray* array =
            newUint16Array(broker, bluelightCapabilities.getAlarmStatesSupported(), status);
        if (array == nullptr) {
          // The two texts differ in the case of "array" and both are kept as they stand.
          reportFailure(broker, BlueLightCapabilitiesProvider, status,
                        "Creating array for Property                         "
                        "RequestedAlarmStatesSupported failed.",
                        "Creating Array for Property                         "
                        "RequestedAlarmStatesSupported failed.");
        } else {
          CMSetProperty(instance, "RequestedAlarmStatesSupported", &array, CMPI_uint16A);
        }
      }
    }
  }

  KESTA_TRACE_PARA(loggerBlueLightObjFactory, kTraceLevel, EXITING, parameters);
  return result;
}

// ---------------------------------------------------------------------------------------------
// Instances by key and all instances
// ---------------------------------------------------------------------------------------------

namespace {

// The instance builder of one kind of record.
template <typename Record>
using MakeInstance = CMPIInstance* (BlueLightFactory::*)(const CMPIBroker*, const CMPIObjectPath*,
                                                         Record, const char**, bool, CMPIStatus*);

// Appends the instance of the record whose key is `key`, made with `make`, for the public method
// named by `site`: 0 found, 1 not found (nothing appended, no exit line).
template <typename Record>
int appendInstanceOf(const TraceSite& site, BlueLightFactory& factory, MakeInstance<Record> make,
                     const std::map<std::string, Record>& records, const CMPIBroker* broker,
                     const CMPIObjectPath* ref, CMPIString* key, const char** properties,
                     std::vector<CMPIInstance*>& instances, CMPIStatus* status) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " broker=" << broker << " ref=" << ref << " key=" << key << " properties=" << properties
         << " instances=" << &instances << " rc=" << status;
  };
  emitTracePara(site, kSourceFile, loggerBlueLightObjFactory, kTraceLevel, ENTERING, parameters);

  // A missing key or one without characters names no record.
  const char* keyChars = charsOf(key, status);
  if (keyChars == nullptr) return 1;
  const auto found = records.find(std::string(keyChars));
  if (found == records.end()) return 1;

  instances.push_back((factory.*make)(broker, ref, found->second, properties, false, status));

  emitTracePara(site, kSourceFile, loggerBlueLightObjFactory, kTraceLevel, EXITING, parameters);
  return 0;
}

// Appends the instance of every record of `records`, in key order, made with `make`, for the
// public method named by `site`; always 0. `statusKey` labels the status in the parameter list.
template <typename Record>
int appendAllInstances(const TraceSite& site, BlueLightFactory& factory, MakeInstance<Record> make,
                       const std::map<std::string, Record>& records, const char* statusKey,
                       const CMPIBroker* broker, const CMPIObjectPath* ref, const char** properties,
                       bool isObjPath, std::vector<CMPIInstance*>& instances, CMPIStatus* status) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " broker=" << broker << " ref=" << ref << " properties=" << properties
         << " isObjPath=" << isObjPath << " instances=" << &instances << statusKey << status;
  };
  emitTracePara(site, kSourceFile, loggerBlueLightObjFactory, kTraceLevel, ENTERING, parameters);

  for (const auto& entry : records) {
    instances.push_back((factory.*make)(broker, ref, entry.second, properties, isObjPath, status));
  }

  emitTracePara(site, kSourceFile, loggerBlueLightObjFactory, kTraceLevel, EXITING, parameters);
  return 0;
}

}  // namespace

int BlueLightFactory::getOneBlueLightCMPIInstance(const CMPIBroker* broker,
                                                  const CMPIObjectPath* ref, CMPIString* key,
                                                  const char** properties,
                                                  std::vector<CMPIInstance*>& instances,
                                                  CMPIStatus* status) {
  return appendInstanceOf(KESTA_TRACE_SITE, *this, &BlueLightFactory::makeBlueLightInstance,
                          _blueLightMap, broker, ref, key, properties, instances, status);
}

int BlueLightFactory::getAllBlueLightCMPIInstances(const CMPIBroker* broker,
                                                   const CMPIObjectPath* ref,
                                                   const char** properties, bool isObjPath,
                                                   std::vector<CMPIInstance*>& instances,
                                                   CMPIStatus* status) {
  // The status key has no leading blank here; the line has always been written so.
  return appendAllInstances(KESTA_TRACE_SITE, *this, &BlueLightFactory::makeBlueLightInstance,
                            _blueLightMap, "rc=", broker, ref, properties, isObjPath, instances,
                            status);
}

int BlueLightFactory::getAllBlueLightCapabilitiesCMPIInstances(
    const CMPIBroker* broker, const CMPIObjectPath* ref, const char** properties, bool isObjPath,
    std::vector<CMPIInstance*>& instances, CMPIStatus* status) {
  return appendAllInstances(KESTA_TRACE_SITE, *this,
                            &BlueLightFactory::makeBlueLightCapabilitiesInstance, _capabilitiesMap,
                            " rc=", broker, ref, properties, isObjPath, instances, status);
}

int BlueLightFactory::getOneBlueLightCapabilitiesCMPIInstance(
    const CMPIBroker* broker, const CMPIObjectPath* ref, CMPIString* key, const char** properties,
    std::vector<CMPIInstance*>& instances, CMPIStatus* status) {
  return appendInstanceOf(KESTA_TRACE_SITE, *this,
                          &BlueLightFactory::makeBlueLightCapabilitiesInstance, _capabilitiesMap,
                          broker, ref, key, properties, instances, status);
}

// ---------------------------------------------------------------------------------------------
// Association targets
// ---------------------------------------------------------------------------------------------

namespace {

// One row of the association decision table.
struct AssociationTarget {
  const char* sourceClass;
  const char* associationClass;
  const char* targetClass;
  const char* component;
  const char* text;
};

const AssociationTarget kAssociationTargets[] = {
    {ComputerSystemClass, BlueLightSystemDeviceClass, BlueLightClass, BlueLightSystemDeviceProvider,
     "Target Class is BlueLightClass"},
    {BlueLightClass, BlueLightSystemDeviceClass, ComputerSystemClass, BlueLightSystemDeviceProvider,
     "Target Class is ComputerSystemClass"},
    {BlueLightClass, BlueLightElementCapabilitiesClass, BlueLightCapabilitiesClass,
     BlueLightElementCapabilitiesProvider, "Target Class is BlueLightCapabilitiesClass"},
    {BlueLightCapabilitiesClass, BlueLightElementCapabilitiesClass, BlueLightClass,
     BlueLightElementCapabilitiesProvider, "Target Class is BlueLightClass"},
};

// True when both texts exist and are equal, byte for byte.
bool sameText(const char* first, const char* second) {
  return first != nullptr && second != nullptr && std::strcmp(first, second) == 0;
}

// The parameter list of both association-target methods. The class names go through the stream's
// text inserter: a null one stops the list there.
auto targetParameters(const CMPIBroker* broker, const CMPIObjectPath* ref,
                      const char* _RefLeftClass, const char* _RefRightClass, CMPIStatus* status) {
  return [=](VNLog::VNMessageBuffer& list) {
    std::ostream& stream = list << " broker=" << broker;
    stream << " ref=" << ref << " _RefLeftClass=" << _RefLeftClass
           << " _RefRightClass=" << _RefRightClass << " rc=" << status;
  };
}

}  // namespace

const char* BlueLightFactory::get_assoc_targetClass_Name(const CMPIBroker* broker,
                                                         const CMPIObjectPath* ref,
                                                         const char* _RefLeftClass,
                                                         const char* _RefRightClass,
                                                         CMPIStatus* status) {
  auto parameters = targetParameters(broker, ref, _RefLeftClass, _RefRightClass, status);
  KESTA_TRACE_PARA(loggerBlueLightObjFactory, kTraceLevel, ENTERING, parameters);

  // A null association class (sent by object managers when the client names none) matches no
  // row, and neither does a path without a class.
  CMPIString* sourceClass = isUsable(ref) ? CMGetClassName(ref, status) : nullptr;
  for (const AssociationTarget& row : kAssociationTargets) {
    if (!sameText(charsOf(sourceClass, status), row.sourceClass)) continue;
    if (!sameText(_RefLeftClass, row.associationClass)) continue;
    traceToBroker(broker, kBrokerTraceInfo, row.component, row.text);
    KESTA_TRACE_PARA(loggerBlueLightObjFactory, kTraceLevel, EXITING, parameters);
    return row.targetClass;
  }
  return nullptr;
}

CMPIObjectPath* BlueLightFactory::get_assoc_targetClass_ObjectPath(const CMPIBroker* broker,
                                                                   const CMPIObjectPath* ref,
                                                                   const char* _RefLeftClass,
                                                                   const char* _RefRightClass,
                                                                   CMPIStatus* status) {
  auto parameters = targetParameters(broker, ref, _RefLeftClass, _RefRightClass, status);
  KESTA_TRACE_PARA(loggerBlueLightObjFactory, kTraceLevel, ENTERING, parameters);

  CMPIObjectPath* result = nullptr;
  const char* target =
      get_assoc_targetClass_Name(broker, ref, _RefLeftClass, _RefRightClass, status);
  if (target != nullptr) {
    // The path names the class only: no keys.
    result = newClassPath(broker, ref, target, status, status);
  }

  KESTA_TRACE_PARA(loggerBlueLightObjFactory, kTraceLevel, EXITING, parameters);
  return result;
}

}  // namespace BlueLightProvider
}  // namespace Kesta
