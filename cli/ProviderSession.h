// The provider library loaded into an in-process broker, with the MIs one operation needs.
//
// Plays the object manager's part around the providers: the broker answers the computer-system
// up-calls as configured, trace messages can be watched as they arrive, and every MI created is
// cleaned up before the library is closed.
#pragma once

#include <cmpidt.h>
#include <cmpift.h>
#include <cmpihost/broker.h>
#include <cmpihost/provider_library.h>
#include <cmpihost/records.h>

#include <functional>
#include <optional>
#include <string>
#include <vector>

namespace bluelight::cli {

/// What the KESTA_ComputerSystem up-calls answer.
struct ComputerSystemAnswer {
  /// The Name key of each instance returned (CreationClassName is KESTA_ComputerSystem).
  std::vector<std::string> names;
  /// When set, both up-calls fail with this code instead.
  std::optional<CMPIrc> failure;
};

/// The text the failing up-calls carry in their status.
inline constexpr const char* kUpcallFailureMessage =
    "KESTA_ComputerSystem enumeration failed on purpose (--upcall-failure)";

class ProviderSession {
 public:
  using TraceSink = std::function<void(const cmpihost::TraceRecord&)>;
  using LogSink = std::function<void(const cmpihost::LogRecord&)>;

  /// Loads the library. Throws LoadFailure when it cannot be loaded.
  ProviderSession(const std::string& libraryPath, const ComputerSystemAnswer& systems);
  /// Cleans up every MI (terminating), then closes the library.
  ~ProviderSession();
  ProviderSession(const ProviderSession&) = delete;
  ProviderSession& operator=(const ProviderSession&) = delete;

  /// Watches the broker's trace and log messages as they arrive; empty functions stop it.
  void watch(TraceSink traces, LogSink logs);

  /// The instance / association MI of a provider, created on first use. Throws LoadFailure when
  /// the factory function is missing or fails.
  CMPIInstanceMI* instanceMI(const std::string& provider);
  CMPIAssociationMI* associationMI(const std::string& provider);

  cmpihost::Broker& broker() { return broker_; }
  const std::string& libraryPath() const { return library_.path(); }

 private:
  template <class MI>
  struct Created {
    std::string provider;
    MI* mi;
  };

  // Declared in this order so the library closes before the broker goes, and the MIs are
  // cleaned up (in the destructor's body) before either.
  cmpihost::Broker broker_;
  cmpihost::ProviderLibrary library_;
  std::vector<Created<CMPIInstanceMI>> instanceMIs_;
  std::vector<Created<CMPIAssociationMI>> associationMIs_;
};

}  // namespace bluelight::cli
