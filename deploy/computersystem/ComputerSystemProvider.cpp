// The instance provider of KESTA_ComputerSystem for hosts where nothing else publishes one.
//
// The blue lights name their system as SystemCreationClassName "KESTA_ComputerSystem" and
// SystemName Kesta::getSystemName(), and KESTA_BlueLightSystemDevice pairs every light with the
// KESTA_ComputerSystem instances the object manager knows. Without an instance of that class the
// association is empty and the lights' system keys point at nothing, so this provider publishes
// exactly one: this host, under the same name the lights use.
//
// It is read-only and keeps no state between operations: every operation asks the platform for
// the system name again, so a changed KESTA_SYSTEM_NAME shows up at once, as it does for the
// lights.
#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>

#include <atomic>
#include <string>

#include "KestaCommon.h"
#include "text/Text.h"

namespace Kesta {
namespace ComputerSystemProvider {
namespace {

constexpr const char* kClassName = "KESTA_ComputerSystem";

// CIM_System.NameFormat "IP": the Name is the host's DNS name, which is what getSystemName()
// returns unless an administrator overrides it.
constexpr const char* kNameFormat = "IP";
// CIM_ComputerSystem.Dedicated 0 "Not Dedicated": a general-purpose server, not an appliance.
constexpr CMPIUint16 kDedicatedNotDedicated = 0;
// CIM_EnabledLogicalElement.EnabledState 2 "Enabled": the system runs the object manager that
// asks, so it is up.
constexpr CMPIUint16 kEnabledStateEnabled = 2;
// RequestedState 12 "Not Applicable": this provider offers no state changes.
constexpr CMPIUint16 kRequestedStateNotApplicable = 12;

// The broker handed to the factory; null until it has run. Read once per operation.
std::atomic<const CMPIBroker*> broker{nullptr};

CMPIStatus status(CMPIrc rc) { return CMPIStatus{rc, nullptr}; }

// A failed status with a message, when there is a broker to make the message with.
CMPIStatus failure(const CMPIBroker* mb, CMPIrc rc, const char* text) {
  return CMPIStatus{rc, mb != nullptr ? CMNewString(mb, text, nullptr) : nullptr};
}

// The characters of a string value of either string type; null for anything else.
const char* charsOfData(const CMPIData& data) {
  if ((data.state & CMPI_nullValue) != 0) return nullptr;
  if (data.type == CMPI_chars) return data.value.chars;
  if (data.type == CMPI_string && data.value.string != nullptr &&
      data.value.string->hdl != nullptr) {
    return CMGetCharsPtr(data.value.string, nullptr);
  }
  return nullptr;
}

// The namespace of the request path; an empty one when the broker gives none.
std::string nameSpaceOf(const CMPIObjectPath* ref) {
  if (CMIsNullObject(ref)) return std::string();
  CMPIString* text = CMGetNameSpace(ref, nullptr);
  if (CMIsNullObject(text)) return std::string();
  const char* chars = CMGetCharsPtr(text, nullptr);
  return chars != nullptr ? std::string(chars) : std::string();
}

// True when `name` is wanted by a property list: a null list wants everything, otherwise CIM
// property names are compared ignoring case.
bool wanted(const char** properties, const char* name) {
  if (properties == nullptr) return true;
  for (const char** entry = properties; *entry != nullptr; ++entry) {
    if (platform::equalsIgnoringCase(*entry, name)) return true;
  }
  return false;
}

// The object path of this system's instance in the namespace of `ref`; null when the broker
// could not make it.
CMPIObjectPath* systemPath(const CMPIBroker* mb, const CMPIObjectPath* ref,
                           const std::string& systemName) {
  CMPIObjectPath* path = CMNewObjectPath(mb, nameSpaceOf(ref).c_str(), kClassName, nullptr);
  if (CMIsNullObject(path)) return nullptr;
  CMSetHostname(path, systemName.c_str());
  CMAddKey(path, "CreationClassName", kClassName, CMPI_chars);
  CMAddKey(path, "Name", systemName.c_str(), CMPI_chars);
  return path;
}

// This system's instance with the properties `properties` asks for (the keys always); null when
// the broker could not make it.
CMPIInstance* systemInstance(const CMPIBroker* mb, const CMPIObjectPath* ref,
                             const std::string& systemName, const char** properties) {
  CMPIObjectPath* path = systemPath(mb, ref, systemName);
  if (path == nullptr) return nullptr;
  CMPIInstance* instance = CMNewInstance(mb, path, nullptr);
  if (CMIsNullObject(instance)) return nullptr;

  // The filter is set as well as checked here: a broker may drop unwanted properties itself, but
  // not every one does, and the client must get what it asked for either way.
  const char* keyNames[] = {"CreationClassName", "Name", nullptr};
  CMSetPropertyFilter(instance, properties, keyNames);
  CMSetProperty(instance, "CreationClassName", kClassName, CMPI_chars);
  CMSetProperty(instance, "Name", systemName.c_str(), CMPI_chars);
  if (wanted(properties, "ElementName")) {
    CMSetProperty(instance, "ElementName", systemName.c_str(), CMPI_chars);
  }
  if (wanted(properties, "NameFormat")) {
    CMSetProperty(instance, "NameFormat", kNameFormat, CMPI_chars);
  }
  if (wanted(properties, "Dedicated")) {
    CMPIArray* dedicated = CMNewArray(mb, 1, CMPI_uint16, nullptr);
    if (CMIsNullObject(dedicated)) return nullptr;
    CMPIUint16 value = kDedicatedNotDedicated;
    CMSetArrayElementAt(dedicated, 0, &value, CMPI_uint16);
    CMSetProperty(instance, "Dedicated", &dedicated, CMPI_uint16A);
  }
  if (wanted(properties, "EnabledState")) {
    CMPIUint16 value = kEnabledStateEnabled;
    CMSetProperty(instance, "EnabledState", &value, CMPI_uint16);
  }
  if (wanted(properties, "RequestedState")) {
    CMPIUint16 value = kRequestedStateNotApplicable;
    CMSetProperty(instance, "RequestedState", &value, CMPI_uint16);
  }
  return instance;
}

// True when `cop` names this system: both keys present, CreationClassName equal to the class
// name and Name equal to the system name. Both comparisons ignore ASCII case, because class names
// are case-insensitive in CIM and so are DNS names, and neither depends on the locale the object
// manager's process may have set.
bool namesThisSystem(const CMPIObjectPath* cop, const std::string& systemName) {
  if (CMIsNullObject(cop)) return false;
  const char* creationClassName = charsOfData(CMGetKey(cop, "CreationClassName", nullptr));
  const char* name = charsOfData(CMGetKey(cop, "Name", nullptr));
  return creationClassName != nullptr && name != nullptr &&
         platform::equalsIgnoringCase(creationClassName, kClassName) &&
         platform::equalsIgnoringCase(name, systemName);
}

CMPIStatus cleanup(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) { return status(CMPI_RC_OK); }

CMPIStatus enumInstanceNames(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,
                             const CMPIObjectPath* ref) {
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return status(CMPI_RC_ERR_FAILED);
  CMPIObjectPath* path = systemPath(mb, ref, Kesta::getSystemName());
  if (path == nullptr) {
    return failure(mb, CMPI_RC_ERR_FAILED, "cannot create the object path of the computer system");
  }
  CMReturnObjectPath(result, path);
  CMReturnDone(result);
  return status(CMPI_RC_OK);
}

CMPIStatus enumInstances(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,
                         const CMPIObjectPath* ref, const char** properties) {
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return status(CMPI_RC_ERR_FAILED);
  CMPIInstance* instance = systemInstance(mb, ref, Kesta::getSystemName(), properties);
  if (instance == nullptr) {
    return failure(mb, CMPI_RC_ERR_FAILED, "cannot create the computer system instance");
  }
  CMReturnInstance(result, instance);
  CMReturnDone(result);
  return status(CMPI_RC_OK);
}

CMPIStatus getInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result,
                       const CMPIObjectPath* cop, const char** properties) {
  const CMPIBroker* const mb = broker.load();
  if (mb == nullptr) return status(CMPI_RC_ERR_FAILED);
  const std::string systemName = Kesta::getSystemName();
  // Any other name is another machine, which this provider knows nothing about: the object
  // manager turns NOT_FOUND into the client's CIM_ERR_NOT_FOUND.
  if (!namesThisSystem(cop, systemName)) {
    return failure(mb, CMPI_RC_ERR_NOT_FOUND, "no such computer system on this host");
  }
  CMPIInstance* instance = systemInstance(mb, cop, systemName, properties);
  if (instance == nullptr) {
    return failure(mb, CMPI_RC_ERR_FAILED, "cannot create the computer system instance");
  }
  CMReturnInstance(result, instance);
  CMReturnDone(result);
  return status(CMPI_RC_OK);
}

// The host is not created, changed or removed through CIM.
CMPIStatus createInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                          const CMPIObjectPath*, const CMPIInstance*) {
  return status(CMPI_RC_ERR_NOT_SUPPORTED);
}

CMPIStatus modifyInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                          const CMPIObjectPath*, const CMPIInstance*, const char**) {
  return status(CMPI_RC_ERR_NOT_SUPPORTED);
}

CMPIStatus deleteInstance(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*,
                          const CMPIObjectPath*) {
  return status(CMPI_RC_ERR_NOT_SUPPORTED);
}

// Object managers evaluate queries themselves over the enumeration when a provider declines.
CMPIStatus execQuery(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath*,
                     const char*, const char*) {
  return status(CMPI_RC_ERR_NOT_SUPPORTED);
}

CMPIInstanceMIFT functionTable = {CMPICurrentVersion,
                                  CMPICurrentVersion,
                                  "instanceKestaComputerSystemProvider",
                                  cleanup,
                                  enumInstanceNames,
                                  enumInstances,
                                  getInstance,
                                  createInstance,
                                  modifyInstance,
                                  deleteInstance,
                                  execQuery};

}  // namespace
}  // namespace ComputerSystemProvider
}  // namespace Kesta

// The only symbol the library exports (see exports.map); the name is what the registrations say.
CMPI_EXTERN_C CMPIInstanceMI* KestaComputerSystemProvider_Create_InstanceMI(
    const CMPIBroker* brkr, const CMPIContext* /*ctx*/, CMPIStatus* rc) {
  static CMPIInstanceMI mi = {nullptr, &Kesta::ComputerSystemProvider::functionTable};
  Kesta::ComputerSystemProvider::broker.store(brkr);
  if (rc != nullptr) *rc = CMPIStatus{CMPI_RC_OK, nullptr};
  return &mi;
}
