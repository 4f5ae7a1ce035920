// The broker: the object-manager side of CMPI that a provider talks to.
//
// A Broker owns one CMPIBroker with its four function tables and implements the encapsulated
// types (strings, arrays, object paths, instances, enumerations, results, contexts, args,
// date/times). It also holds what a test configures (class keys, answers to up-calls, faults) and
// what it records (calls, traces, logs, results).
//
// Ownership follows object managers: every object the broker creates belongs to the Request that
// is current on the creating thread and is freed when that request ends; objects created with no
// current request belong to the Broker and are freed with it. A provider may release objects
// early with CMRelease; the request's later cleanup knows and does not free them twice.
//
// Thread safety: several threads may run requests on one Broker at once. Each request's objects
// are its own; configuration, records and fault counters are locked. The Broker must outlive
// every Request made on it.
#pragma once

#include <cmpift.h>
#include <cmpihost/faults.h>
#include <cmpihost/records.h>
#include <cmpihost/status.h>
#include <cmpihost/value.h>

#include <cstddef>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace cmpihost {

namespace detail {
class BrokerCore;
}

/// How a Broker presents itself.
struct BrokerOptions {
  std::string name = "cmpihost";  ///< CMPIBrokerFT.brokerName
  /// CMPIBrokerFT.brokerVersion and the ftVersion of every table; providers whose miVersion is
  /// larger are refused by createInstanceMI/createAssociationMI.
  int version = 200;
  unsigned int capabilities = CMPI_MB_Class_0 | CMPI_MB_Supports_MemEnhancements;
  bool recording = true;  ///< whether calls, traces, logs and results are recorded from the start
};

/// Called for every trace message as it arrives (also when recording is off).
using TraceCallback = std::function<void(const TraceRecord&)>;
/// Called for every log message as it arrives (also when recording is off).
using LogCallback = std::function<void(const LogRecord&)>;

/// The in-process broker. Not copyable or movable: providers keep its CMPIBroker pointer.
class Broker {
 public:
  explicit Broker(BrokerOptions options = {});
  ~Broker();
  Broker(const Broker&) = delete;
  Broker& operator=(const Broker&) = delete;
  Broker(Broker&&) = delete;
  Broker& operator=(Broker&&) = delete;

  /// The CMPIBroker handed to providers.
  const CMPIBroker* cmpi() const;
  const BrokerOptions& options() const;

  // ---- Classes ----------------------------------------------------------------------------

  /// Sets the key property names of a class; CMPIInstanceFT.getObjectPath takes the keys of an
  /// instance from these. Known from the start: KESTA_BlueLight, KESTA_BlueLightCapabilities,
  /// KESTA_BlueLightElementCapabilities, KESTA_BlueLightSystemDevice, KESTA_ComputerSystem.
  void setClassKeys(std::string className, std::vector<std::string> keyNames);
  /// The key property names of a class (class name compared ignoring case), or nullopt.
  std::optional<std::vector<std::string>> classKeys(std::string_view className) const;
  /// Declares a superclass, for CMPIBrokerEncFT.classPathIsA (which otherwise only knows that a
  /// class is itself).
  void setSuperclass(const std::string& className, const std::string& superclassName);

  // ---- Up-calls ---------------------------------------------------------------------------

  /// Answers CBEnumInstanceNames / CBEnumInstances of `className` with these instances (names
  /// are their paths). Instances without a namespace get the namespace of the path the provider
  /// passed; instances whose path has no keys get them from their key properties (see
  /// setClassKeys). A property list given to CBEnumInstances keeps the listed properties and the
  /// key properties. Replaces an earlier answer or failure for the class.
  void setUpcallInstances(const std::string& className, std::vector<InstanceValue> instances);
  /// Makes both enumeration up-calls of `className` fail: they return null and set *rc to
  /// `status`.
  void setUpcallFailure(const std::string& className, StatusValue status);
  /// Forgets what was configured for the class. Up-calls of classes with nothing configured
  /// return an empty enumeration with CMPI_RC_OK.
  void clearUpcall(std::string_view className);
  void clearUpcalls();

  // ---- Recording --------------------------------------------------------------------------

  void setRecording(bool on);
  bool recording() const;
  /// Copies of everything recorded so far by all requests (and outside requests), in order.
  std::vector<CallRecord> calls() const;
  std::vector<TraceRecord> traces() const;
  std::vector<LogRecord> logs() const;
  std::vector<ResultEvent> results() const;
  void clearRecords();
  /// Replaces the trace callback; an empty function removes it.
  void setTraceCallback(TraceCallback callback);
  void setLogCallback(LogCallback callback);

  // ---- Faults -----------------------------------------------------------------------------

  /// Arms a fault (see faults.h). Throws std::invalid_argument for an InvalidateHandle fault
  /// whose object function is not valid().
  FaultId armFault(const Fault& fault);
  /// Disarms one fault; false when the id is unknown.
  bool disarmFault(FaultId id);
  void clearFaults();
  /// How often the fault has fired so far (also after it was disarmed; 0 for unknown ids).
  std::uint64_t faultFireCount(FaultId id) const;
  /// Calls of each creating function since the broker was made or the counts were reset.
  CreationCounts creationCounts() const;
  void resetCreationCounts();

  // ---- Ownership --------------------------------------------------------------------------

  /// Objects of this broker that are alive now, in all requests and in the broker itself.
  std::size_t liveObjectCount() const;
  /// Objects that belong to the broker itself (made while no request was current).
  std::size_t brokerOwnedObjectCount() const;

  /// The implementation; for the host's own sources.
  detail::BrokerCore& core() const { return *core_; }

 private:
  std::unique_ptr<detail::BrokerCore> core_;
};

}  // namespace cmpihost
