#include "ProviderMap.h"

#include "ProviderTable.h"
#include "text/Text.h"

namespace bluelight::cli {

namespace {

// The class names of deploy/providers.txt, named by its symbol column as in the module.
#define BLUELIGHT_CLI_CLASS_NAME(symbol, className) \
  [[maybe_unused]] constexpr const char* symbol = className;
BLUELIGHT_TABLE_CLASSES(BLUELIGHT_CLI_CLASS_NAME)
#undef BLUELIGHT_CLI_CLASS_NAME

}  // namespace

const char* const kComputerSystemClass = ComputerSystemClass;

const std::vector<ProviderInfo>& allProviders() {
  // Every row has an instance MI: object managers route the instance operations of association
  // classes to it too, and the deploy tests hold the table to that.
#define BLUELIGHT_CLI_PROVIDER(className, provider, instance, association) \
  {provider, className, association},
  static const std::vector<ProviderInfo> providers = {
      BLUELIGHT_TABLE_ROWS_bluelightprofileprovider(BLUELIGHT_CLI_PROVIDER)};
#undef BLUELIGHT_CLI_PROVIDER
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
