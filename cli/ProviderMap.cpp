#include "ProviderMap.h"

#include "text/Text.h"

namespace bluelight::cli {

const std::vector<ProviderInfo>& allProviders() {
  static const std::vector<ProviderInfo> providers = {
      {"BlueLightProfileProvider", "KESTA_BlueLight", false},
      {"BlueLightCapabilitiesProvider", "KESTA_BlueLightCapabilities", false},
      {"BlueLightElementCapabilitiesProvider", "KESTA_BlueLightElementCapabilities", true},
      {"BlueLightSystemDeviceProvider", "KESTA_BlueLightSystemDevice", true},
  };
  return providers;
}

const ProviderInfo* instanceProviderFor(std::string_view className) {
  for (const ProviderInfo& provider : allProviders()) {
    if (Kesta::platform::equalsIgnoringCase(className, provider.className)) return &provider;
  }
  return nullptr;
}

const ProviderInfo* associationProviderFor(std::string_view className) {
  const ProviderInfo* provider = instanceProviderFor(className);
  return provider != nullptr && provider->association ? provider : nullptr;
}

std::vector<const ProviderInfo*> associationProviders() {
  std::vector<const ProviderInfo*> providers;
  for (const ProviderInfo& provider : allProviders()) {
    if (provider.association) providers.push_back(&provider);
  }
  return providers;
}

std::string canonicalClassName(std::string_view className) {
  if (const ProviderInfo* provider = instanceProviderFor(className)) return provider->className;
  if (Kesta::platform::equalsIgnoringCase(className, kComputerSystemClass))
    return kComputerSystemClass;
  return std::string(className);
}

}  // namespace bluelight::cli
