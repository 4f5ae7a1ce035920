// Names that every unit of the module uses: the CIM classes it serves or meets, the provider
// names given to the broker's trace facility, and small helpers for the namespace of a path.
// Each unit that includes this header gets its own copies of the constants. The class and
// provider names are those of deploy/providers.txt (last in this header), so the module cannot
// call a class or a provider other than the registrations do.
#ifndef KESTA_BLUELIGHTNAMES_H
#define KESTA_BLUELIGHTNAMES_H

#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>

// Generated from deploy/providers.txt, which the registrations are generated from too.
#include "ProviderTable.h"

namespace Kesta {
namespace BlueLightProvider {

// Levels of the broker's trace facility.
inline constexpr int kBrokerTraceInfo = CMPI_LEV_INFO;
inline constexpr int kBrokerTraceWarning = CMPI_LEV_WARNING;

// The class names, one constant for every class of deploy/providers.txt, named by its symbol
// column: BlueLightClass, BlueLightCapabilitiesClass, BlueLightElementCapabilitiesClass,
// BlueLightSystemDeviceClass and ComputerSystemClass ("KESTA_BlueLight", ...).
#define KESTA_BLUELIGHT_CLASS_NAME(symbol, className) \
  inline constexpr const char* symbol = className;
BLUELIGHT_TABLE_CLASSES(KESTA_BLUELIGHT_CLASS_NAME)
#undef KESTA_BLUELIGHT_CLASS_NAME

// The names of the module's providers, one constant each, named as the provider:
// BlueLightProfileProvider, BlueLightCapabilitiesProvider, BlueLightElementCapabilitiesProvider
// and BlueLightSystemDeviceProvider ("BlueLightProfileProvider", ...). They are the names the
// registrations give the providers, and the prefixes of the factory functions.
#define KESTA_BLUELIGHT_PROVIDER_NAME(symbol, provider) \
  inline constexpr const char* symbol = provider;
BLUELIGHT_TABLE_PROVIDERS_bluelightprofileprovider(KESTA_BLUELIGHT_PROVIDER_NAME)
#undef KESTA_BLUELIGHT_PROVIDER_NAME

    namespace {

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
