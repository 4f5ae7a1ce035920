// The convenience driver: run one CIM read operation on an MI and get everything back as values.
//
// Each function makes a fresh Request, builds the inputs in it, calls the MI's table function the
// way an object manager does, snapshots the returned status, and ends the request (freeing every
// object of it) before returning.
#pragma once

#include <cmpift.h>
#include <cmpihost/records.h>
#include <cmpihost/request.h>
#include <cmpihost/status.h>
#include <cmpihost/value.h>

#include <cstddef>
#include <functional>
#include <vector>

namespace cmpihost {

class Broker;

/// What one operation produced.
struct Outcome {
  /// The CMPIStatus the MI returned. When the MI (or the function slot) is missing, the driver
  /// reports CMPI_RC_ERR_INVALID_HANDLE or CMPI_RC_ERR_NOT_SUPPORTED with its own message and
  /// calls nothing.
  StatusValue status;
  /// Everything handed to the result, in order (including the returnDone events).
  std::vector<ResultEvent> results;
  /// How often returnDone was called.
  std::size_t doneCount = 0;
  /// What was recorded during the request (empty while recording is off).
  std::vector<CallRecord> calls;
  std::vector<TraceRecord> traces;
  std::vector<LogRecord> logs;

  /// The valid instances handed over, in order.
  std::vector<InstanceValue> instances() const;
  /// The valid object paths handed over, in order.
  std::vector<ObjectPathValue> paths() const;
  /// The number of result events of that kind (valid or not).
  std::size_t count(ResultKind kind) const;
};

/// Runs `operation` in a fresh Request and collects its Outcome. `operation` calls the MI and
/// returns its status; use it for calls the functions below cannot express (a null object path,
/// say).
Outcome run(Broker& broker, const std::function<CMPIStatus(Request&)>& operation,
            const RequestOptions& options = {});

Outcome enumerateInstanceNames(Broker& broker, CMPIInstanceMI* mi, const ObjectPathValue& path,
                               const RequestOptions& options = {});
Outcome enumerateInstances(Broker& broker, CMPIInstanceMI* mi, const ObjectPathValue& path,
                           const PropertyList& properties = std::nullopt,
                           const RequestOptions& options = {});
Outcome getInstance(Broker& broker, CMPIInstanceMI* mi, const ObjectPathValue& path,
                    const PropertyList& properties = std::nullopt,
                    const RequestOptions& options = {});
Outcome associators(Broker& broker, CMPIAssociationMI* mi, const ObjectPathValue& path,
                    const OptionalText& assocClass = std::nullopt,
                    const OptionalText& resultClass = std::nullopt,
                    const OptionalText& role = std::nullopt,
                    const OptionalText& resultRole = std::nullopt,
                    const PropertyList& properties = std::nullopt,
                    const RequestOptions& options = {});
Outcome associatorNames(Broker& broker, CMPIAssociationMI* mi, const ObjectPathValue& path,
                        const OptionalText& assocClass = std::nullopt,
                        const OptionalText& resultClass = std::nullopt,
                        const OptionalText& role = std::nullopt,
                        const OptionalText& resultRole = std::nullopt,
                        const RequestOptions& options = {});
Outcome references(Broker& broker, CMPIAssociationMI* mi, const ObjectPathValue& path,
                   const OptionalText& resultClass = std::nullopt,
                   const OptionalText& role = std::nullopt,
                   const PropertyList& properties = std::nullopt,
                   const RequestOptions& options = {});
Outcome referenceNames(Broker& broker, CMPIAssociationMI* mi, const ObjectPathValue& path,
                       const OptionalText& resultClass = std::nullopt,
                       const OptionalText& role = std::nullopt, const RequestOptions& options = {});

/// Calls the MI's cleanup (in a fresh Request) and returns its status.
Outcome cleanup(Broker& broker, CMPIInstanceMI* mi, bool terminating = true);
Outcome cleanup(Broker& broker, CMPIAssociationMI* mi, bool terminating = true);

}  // namespace cmpihost
