#include "ProviderSession.h"

#include <cmpihost/driver.h>
#include <cmpihost/request.h>

#include <filesystem>
#include <system_error>
#include <utility>

#include "ProviderMap.h"
#include "UsageError.h"

namespace bluelight::cli {

namespace {

cmpihost::BrokerOptions brokerOptions() {
  cmpihost::BrokerOptions options;
  // The tool needs what the providers hand over, not the record of every broker call.
  options.recording = false;
  return options;
}

cmpihost::ProviderLibrary openLibrary(const std::string& path) {
  std::error_code ignored;
  if (!std::filesystem::exists(path, ignored)) {
    throw LoadFailure("the provider library " + path + " does not exist");
  }
  try {
    return cmpihost::ProviderLibrary(path);
  } catch (const cmpihost::LoadError& error) {
    // The loader's text names the library and says why it could not be loaded.
    throw LoadFailure(error.what());
  }
}

cmpihost::InstanceValue computerSystem(const std::string& name) {
  // No namespace: the broker gives each instance the namespace the provider asks in.
  cmpihost::InstanceValue system(cmpihost::ObjectPathValue("", kComputerSystemClass));
  system.set("CreationClassName", kComputerSystemClass).set("Name", name);
  system.path().addKey("CreationClassName", kComputerSystemClass).addKey("Name", name);
  return system;
}

}  // namespace

ProviderSession::ProviderSession(const std::string& libraryPath,
                                 const ComputerSystemAnswer& systems)
    : broker_(brokerOptions()), library_(openLibrary(libraryPath)) {
  if (systems.failure) {
    broker_.setUpcallFailure(kComputerSystemClass,
                             cmpihost::StatusValue(*systems.failure, kUpcallFailureMessage));
  } else {
    std::vector<cmpihost::InstanceValue> instances;
    for (const std::string& name : systems.names) instances.push_back(computerSystem(name));
    broker_.setUpcallInstances(kComputerSystemClass, std::move(instances));
  }
}

ProviderSession::~ProviderSession() {
  // Providers must not be called after dlclose, and cleanup is their last call.
  for (const auto& created : associationMIs_) cmpihost::cleanup(broker_, created.mi);
  for (const auto& created : instanceMIs_) cmpihost::cleanup(broker_, created.mi);
}

void ProviderSession::watch(TraceSink traces, LogSink logs) {
  broker_.setTraceCallback(std::move(traces));
  broker_.setLogCallback(std::move(logs));
}

CMPIInstanceMI* ProviderSession::instanceMI(const std::string& provider) {
  for (const auto& created : instanceMIs_) {
    if (created.provider == provider) return created.mi;
  }
  cmpihost::InstanceMILoad load;
  {
    cmpihost::Request request(broker_);
    load = cmpihost::createInstanceMI(library_, provider, broker_, request);
  }
  if (!load.ok()) {
    throw LoadFailure("cannot create the instance MI of " + provider + " from " + library_.path() +
                      ": " + load.error);
  }
  instanceMIs_.push_back({provider, load.mi});
  return load.mi;
}

CMPIAssociationMI* ProviderSession::associationMI(const std::string& provider) {
  for (const auto& created : associationMIs_) {
    if (created.provider == provider) return created.mi;
  }
  cmpihost::AssociationMILoad load;
  {
    cmpihost::Request request(broker_);
    load = cmpihost::createAssociationMI(library_, provider, broker_, request);
  }
  if (!load.ok()) {
    throw LoadFailure("cannot create the association MI of " + provider + " from " +
                      library_.path() + ": " + load.error);
  }
  associationMIs_.push_back({provider, load.mi});
  return load.mi;
}

}  // namespace bluelight::cli
