#include <cmpihost/broker.h>
#include <cmpihost/convert.h>
#include <cmpihost/provider_library.h>
#include <cmpihost/request.h>

#include <dlfcn.h>

#include <utility>

namespace cmpihost {

ProviderLibrary::ProviderLibrary(std::string path) : path_(std::move(path)) {
  dlerror();  // clear an older error, so that the text below is this call's
  handle_ = dlopen(path_.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (handle_ == nullptr) {
    const char* error = dlerror();
    throw LoadError("cannot load provider library " + path_ + ": " +
                    (error != nullptr ? error : "unknown error"));
  }
}

ProviderLibrary::~ProviderLibrary() { close(); }

ProviderLibrary::ProviderLibrary(ProviderLibrary&& other) noexcept
    : path_(std::move(other.path_)), handle_(std::exchange(other.handle_, nullptr)) {}

ProviderLibrary& ProviderLibrary::operator=(ProviderLibrary&& other) noexcept {
  if (this != &other) {
    close();
    path_ = std::move(other.path_);
    handle_ = std::exchange(other.handle_, nullptr);
  }
  return *this;
}

void ProviderLibrary::close() noexcept {
  if (handle_ != nullptr) dlclose(handle_);
  handle_ = nullptr;
}

void* ProviderLibrary::symbol(const std::string& name, std::string* error) const {
  if (handle_ == nullptr) {
    if (error != nullptr) *error = "the library " + path_ + " is not loaded";
    return nullptr;
  }
  dlerror();
  void* address = dlsym(handle_, name.c_str());
  if (address == nullptr && error != nullptr) {
    const char* text = dlerror();
    *error = text != nullptr ? text : name + " is NULL in " + path_;
  }
  return address;
}

std::string instanceMISymbol(std::string_view providerName) {
  return std::string(providerName) + "_Create_InstanceMI";
}

std::string associationMISymbol(std::string_view providerName) {
  return std::string(providerName) + "_Create_AssociationMI";
}

namespace {

// Both MI kinds are loaded alike: look up the factory, call it, and check what it returned the
// way an object manager does before it lets the MI serve requests.
template <class MI>
MILoadResult<MI> createMI(const ProviderLibrary& library, const std::string& symbolName,
                          Broker& broker, const CMPIContext* context) {
  MILoadResult<MI> result;
  result.symbolName = symbolName;
  std::string error;
  void* address = library.symbol(result.symbolName, &error);
  if (address == nullptr) {
    result.error = "no " + result.symbolName + " in " + library.path() + ": " + error;
    return result;
  }
  using Factory = MI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
  const auto factory = reinterpret_cast<Factory>(address);
  CMPIStatus status{CMPI_RC_OK, nullptr};
  MI* mi = factory(broker.cmpi(), context, &status);
  result.status = toStatusValue(status);
  if (mi == nullptr) {
    result.error = result.symbolName + " returned NULL";
    if (!result.status.ok()) result.error += " (" + result.status.toString() + ")";
    return result;
  }
  if (mi->ft == nullptr) {
    result.error = result.symbolName + " returned an MI without a function table";
    return result;
  }
  result.ftVersion = mi->ft->ftVersion;
  result.miVersion = mi->ft->miVersion;
  result.miName = mi->ft->miName != nullptr ? mi->ft->miName : "";
  if (!result.status.ok()) {
    result.error = result.symbolName + " reported " + result.status.toString();
    return result;
  }
  if (result.miVersion > broker.options().version) {
    result.error = "MI " + result.miName + " needs version " + std::to_string(result.miVersion) +
                   ", the broker offers " + std::to_string(broker.options().version);
    return result;
  }
  result.mi = mi;
  return result;
}

}  // namespace

InstanceMILoad createInstanceMI(const ProviderLibrary& library, std::string_view providerName,
                                Broker& broker, Request& request) {
  return createInstanceMI(library, providerName, broker, request.context());
}

InstanceMILoad createInstanceMI(const ProviderLibrary& library, std::string_view providerName,
                                Broker& broker, const CMPIContext* context) {
  return createMI<CMPIInstanceMI>(library, instanceMISymbol(providerName), broker, context);
}

AssociationMILoad createAssociationMI(const ProviderLibrary& library, std::string_view providerName,
                                      Broker& broker, Request& request) {
  return createAssociationMI(library, providerName, broker, request.context());
}

AssociationMILoad createAssociationMI(const ProviderLibrary& library, std::string_view providerName,
                                      Broker& broker, const CMPIContext* context) {
  return createMI<CMPIAssociationMI>(library, associationMISymbol(providerName), broker, context);
}

}  // namespace cmpihost
