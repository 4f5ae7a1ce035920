// Loading a provider library and creating its MIs, as an object manager does.
#pragma once

#include <cmpift.h>
#include <cmpihost/status.h>

#include <stdexcept>
#include <string>
#include <string_view>

namespace cmpihost {

class Broker;
class Request;

/// Thrown when a provider library cannot be loaded; what() holds dlerror()'s text.
class LoadError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// A provider library opened with dlopen(path, RTLD_NOW | RTLD_LOCAL) and closed with dlclose
/// when the object is destroyed. MIs created from it are invalid after that: call their cleanup
/// first. Movable, not copyable.
class ProviderLibrary {
 public:
  /// Loads the library; throws LoadError when dlopen fails.
  explicit ProviderLibrary(std::string path);
  ~ProviderLibrary();
  ProviderLibrary(ProviderLibrary&& other) noexcept;
  ProviderLibrary& operator=(ProviderLibrary&& other) noexcept;
  ProviderLibrary(const ProviderLibrary&) = delete;
  ProviderLibrary& operator=(const ProviderLibrary&) = delete;

  const std::string& path() const { return path_; }

  /// The address of an exported symbol, or null; `error` (when given) gets dlerror()'s text.
  void* symbol(const std::string& name, std::string* error = nullptr) const;
  bool hasSymbol(const std::string& name) const { return symbol(name) != nullptr; }

 private:
  void close() noexcept;

  std::string path_;
  void* handle_ = nullptr;
};

/// What creating an MI gave.
template <class MI>
struct MILoadResult {
  MI* mi = nullptr;        ///< the MI, null when creating it failed
  std::string symbolName;  ///< the factory looked up, e.g. "Foo_Create_InstanceMI"
  std::string miName;      ///< the table's miName (empty when there is no table or no name)
  int ftVersion = 0;       ///< the table's ftVersion
  int miVersion = 0;       ///< the table's miVersion
  StatusValue status;      ///< what the factory left in its rc argument (CMPI_RC_OK if nothing)
  std::string error;       ///< empty on success, else why the MI cannot be used

  bool ok() const { return mi != nullptr && error.empty(); }
  explicit operator bool() const { return ok(); }
};

using InstanceMILoad = MILoadResult<CMPIInstanceMI>;
using AssociationMILoad = MILoadResult<CMPIAssociationMI>;

/// "<providerName>_Create_InstanceMI" / "<providerName>_Create_AssociationMI".
std::string instanceMISymbol(std::string_view providerName);
std::string associationMISymbol(std::string_view providerName);

/// Looks up and calls the provider's factory with the broker and a context, then checks the MI:
/// a missing symbol, a null MI, a null function table or an miVersion newer than the broker's
/// version are errors (the result's `mi` is then null and `error` says why). Objects the factory
/// creates belong to the request (or, with a bare context, to whatever request is current).
InstanceMILoad createInstanceMI(const ProviderLibrary& library, std::string_view providerName,
                                Broker& broker, Request& request);
InstanceMILoad createInstanceMI(const ProviderLibrary& library, std::string_view providerName,
                                Broker& broker, const CMPIContext* context);
AssociationMILoad createAssociationMI(const ProviderLibrary& library, std::string_view providerName,
                                      Broker& broker, Request& request);
AssociationMILoad createAssociationMI(const ProviderLibrary& library, std::string_view providerName,
                                      Broker& broker, const CMPIContext* context);

}  // namespace cmpihost
