// Names that every unit of the module uses: the CIM classes it serves or meets, the provider
// names given to the broker's trace facility, and small helpers for the namespace of a path.
// Each unit that includes this header gets its own copies of the constants.
#ifndef KESTA_BLUELIGHTNAMES_H
#define KESTA_BLUELIGHTNAMES_H

#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>

namespace Kesta {
namespace BlueLightProvider {
namespace {

const char* const BlueLightClass = "KESTA_BlueLight";
const char* const BlueLightCapabilitiesClass = "KESTA_BlueLightCapabilities";
const char* const BlueLightElementCapabilitiesClass = "KESTA_BlueLightElementCapabilities";
const char* const BlueLightSystemDeviceClass = "KESTA_BlueLightSystemDevice";
const char* const ComputerSystemClass = "KESTA_ComputerSystem";

const char* const BlueLightProfileProvider = "BlueLightProfileProvider";
const char* const BlueLightCapabilitiesProvider = "BlueLightCapabilitiesProvider";
const char* const BlueLightElementCapabilitiesProvider = "BlueLightElementCapabilitiesProvider";
const char* const BlueLightSystemDeviceProvider = "BlueLightSystemDeviceProvider";

// Levels of the broker's trace facility.
constexpr int kBrokerTraceInfo = CMPI_LEV_INFO;
constexpr int kBrokerTraceWarning = CMPI_LEV_WARNING;

// The characters of a CMPI string through its function table, or null when there is no string.
inline const char* charsOf(const CMPIString* text, CMPIStatus* status) {
  if (CMIsNullObject(text)) return nullptr;
  return CMGetCharsPtr(text, status);
}

// The namespace of `path` read through the string's function table, `status` passed to both
// calls; null when the broker gives no namespace.
inline const char* nameSpaceOf(const CMPIObjectPath* path, CMPIStatus* status) {
  if (CMIsNullObject(path)) return nullptr;
  return charsOf(CMGetNameSpace(path, status), status);
}

// The namespace of `path` read straight from the string's handle; null when there is none.
inline const char* nameSpaceCharsOf(const CMPIObjectPath* path, CMPIStatus* status) {
  if (CMIsNullObject(path)) return nullptr;
  CMPIString* text = CMGetNameSpace(path, status);
  if (text == nullptr) return nullptr;
  return CMGetCharPtr(text);
}

// True when `object` can be used: not null and with a handle.
template <typename T>
inline bool isUsable(const T* object) {
  return !CMIsNullObject(object);
}

}  // namespace
}  // namespace BlueLightProvider
}  // namespace Kesta

#endif  // KESTA_BLUELIGHTNAMES_H
