// Which provider of the library serves which class, as an object manager's provider
// registration would say it: the rows of deploy/providers.txt for the library, in its order.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace bluelight::cli {

/// One provider of the library: the name its MI factory functions carry and the class it serves.
struct ProviderInfo {
  const char* name;       ///< e.g. "BlueLightProfileProvider" (-> ..._Create_InstanceMI)
  const char* className;  ///< the class it serves, in its declared spelling
  bool association;       ///< also has an association MI and serves association operations
};

/// The providers in the order they are asked when several are.
const std::vector<ProviderInfo>& allProviders();

/// The provider whose instance MI serves `className` (compared ignoring case), or null.
const ProviderInfo* instanceProviderFor(std::string_view className);
/// The provider whose association MI serves the association class `className`, or null.
const ProviderInfo* associationProviderFor(std::string_view className);
/// Every provider with an association MI, in asking order.
std::vector<const ProviderInfo*> associationProviders();

/// The class the up-calls of the system-device provider ask for.
extern const char* const kComputerSystemClass;

/// A class name the library knows, in its declared spelling (object managers hand providers the
/// name as the class declares it, whatever case the client used); other names unchanged.
std::string canonicalClassName(std::string_view className);

}  // namespace bluelight::cli
