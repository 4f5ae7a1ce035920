#include <cmpihost/broker.h>
#include <cmpihost/convert.h>
#include <cmpihost/driver.h>

#include <optional>
#include <string>

namespace cmpihost {

std::vector<InstanceValue> Outcome::instances() const {
  std::vector<InstanceValue> out;
  for (const ResultEvent& event : results) {
    if (const InstanceValue* instance = event.instance()) out.push_back(*instance);
  }
  return out;
}

std::vector<ObjectPathValue> Outcome::paths() const {
  std::vector<ObjectPathValue> out;
  for (const ResultEvent& event : results) {
    if (const ObjectPathValue* path = event.path()) out.push_back(*path);
  }
  return out;
}

std::size_t Outcome::count(ResultKind kind) const {
  std::size_t n = 0;
  for (const ResultEvent& event : results) n += event.kind == kind ? 1 : 0;
  return n;
}

Outcome run(Broker& broker, const std::function<CMPIStatus(Request&)>& operation,
            const RequestOptions& options) {
  Outcome outcome;
  Request request(broker, options);
  const CMPIStatus status = operation(request);
  // Everything is copied out before the request ends and frees the objects.
  outcome.status = toStatusValue(status);
  outcome.results = request.results();
  outcome.doneCount = request.doneCount();
  outcome.calls = request.calls();
  outcome.traces = request.traces();
  outcome.logs = request.logs();
  return outcome;
}

namespace {

// What the driver reports instead of calling an MI that is not there.
CMPIStatus missing(Request& request, CMPIrc rc, const std::string& text) {
  return CMPIStatus{rc, request.string(text)};
}

// The status to report instead of calling `slot` of the MI, or nullopt when it can be called.
template <class MI, class Slot>
std::optional<CMPIStatus> unavailable(Request& request, const MI* mi, Slot slot,
                                      const char* slotName) {
  if (mi == nullptr || mi->ft == nullptr) {
    return missing(request, CMPI_RC_ERR_INVALID_HANDLE, "the MI is NULL or has no table");
  }
  if (mi->ft->*slot == nullptr) {
    return missing(request, CMPI_RC_ERR_NOT_SUPPORTED,
                   std::string("the MI has no ") + slotName + " function");
  }
  return std::nullopt;
}

}  // namespace

Outcome enumerateInstanceNames(Broker& broker, CMPIInstanceMI* mi, const ObjectPathValue& path,
                               const RequestOptions& options) {
  return run(
      broker,
      [&](Request& request) -> CMPIStatus {
        if (auto status = unavailable(request, mi, &CMPIInstanceMIFT::enumerateInstanceNames,
                                      "enumerateInstanceNames"))
          return *status;
        return mi->ft->enumerateInstanceNames(mi, request.context(), request.result(),
                                              request.objectPath(path));
      },
      options);
}

Outcome enumerateInstances(Broker& broker, CMPIInstanceMI* mi, const ObjectPathValue& path,
                           const PropertyList& properties, const RequestOptions& options) {
  return run(
      broker,
      [&](Request& request) -> CMPIStatus {
        if (auto status = unavailable(request, mi, &CMPIInstanceMIFT::enumerateInstances,
                                      "enumerateInstances"))
          return *status;
        return mi->ft->enumerateInstances(mi, request.context(), request.result(),
                                          request.objectPath(path),
                                          request.propertyList(properties));
      },
      options);
}

Outcome getInstance(Broker& broker, CMPIInstanceMI* mi, const ObjectPathValue& path,
                    const PropertyList& properties, const RequestOptions& options) {
  return run(
      broker,
      [&](Request& request) -> CMPIStatus {
        if (auto status = unavailable(request, mi, &CMPIInstanceMIFT::getInstance, "getInstance"))
          return *status;
        return mi->ft->getInstance(mi, request.context(), request.result(),
                                   request.objectPath(path), request.propertyList(properties));
      },
      options);
}

Outcome associators(Broker& broker, CMPIAssociationMI* mi, const ObjectPathValue& path,
                    const OptionalText& assocClass, const OptionalText& resultClass,
                    const OptionalText& role, const OptionalText& resultRole,
                    const PropertyList& properties, const RequestOptions& options) {
  return run(
      broker,
      [&](Request& request) -> CMPIStatus {
        if (auto status =
                unavailable(request, mi, &CMPIAssociationMIFT::associators, "associators"))
          return *status;
        return mi->ft->associators(mi, request.context(), request.result(),
                                   request.objectPath(path), request.text(assocClass),
                                   request.text(resultClass), request.text(role),
                                   request.text(resultRole), request.propertyList(properties));
      },
      options);
}

Outcome associatorNames(Broker& broker, CMPIAssociationMI* mi, const ObjectPathValue& path,
                        const OptionalText& assocClass, const OptionalText& resultClass,
                        const OptionalText& role, const OptionalText& resultRole,
                        const RequestOptions& options) {
  return run(
      broker,
      [&](Request& request) -> CMPIStatus {
        if (auto status =
                unavailable(request, mi, &CMPIAssociationMIFT::associatorNames, "associatorNames"))
          return *status;
        return mi->ft->associatorNames(mi, request.context(), request.result(),
                                       request.objectPath(path), request.text(assocClass),
                                       request.text(resultClass), request.text(role),
                                       request.text(resultRole));
      },
      options);
}

Outcome references(Broker& broker, CMPIAssociationMI* mi, const ObjectPathValue& path,
                   const OptionalText& resultClass, const OptionalText& role,
                   const PropertyList& properties, const RequestOptions& options) {
  return run(
      broker,
      [&](Request& request) -> CMPIStatus {
        if (auto status = unavailable(request, mi, &CMPIAssociationMIFT::references, "references"))
          return *status;
        return mi->ft->references(mi, request.context(), request.result(), request.objectPath(path),
                                  request.text(resultClass), request.text(role),
                                  request.propertyList(properties));
      },
      options);
}

Outcome referenceNames(Broker& broker, CMPIAssociationMI* mi, const ObjectPathValue& path,
                       const OptionalText& resultClass, const OptionalText& role,
                       const RequestOptions& options) {
  return run(
      broker,
      [&](Request& request) -> CMPIStatus {
        if (auto status =
                unavailable(request, mi, &CMPIAssociationMIFT::referenceNames, "referenceNames"))
          return *status;
        return mi->ft->referenceNames(mi, request.context(), request.result(),
                                      request.objectPath(path), request.text(resultClass),
                                      request.text(role));
      },
      options);
}

Outcome cleanup(Broker& broker, CMPIInstanceMI* mi, bool terminating) {
  return run(broker, [&](Request& request) -> CMPIStatus {
    if (auto status = unavailable(request, mi, &CMPIInstanceMIFT::cleanup, "cleanup"))
      return *status;
    return mi->ft->cleanup(mi, request.context(), terminating ? 1 : 0);
  });
}

Outcome cleanup(Broker& broker, CMPIAssociationMI* mi, bool terminating) {
  return run(broker, [&](Request& request) -> CMPIStatus {
    if (auto status = unavailable(request, mi, &CMPIAssociationMIFT::cleanup, "cleanup"))
      return *status;
    return mi->ft->cleanup(mi, request.context(), terminating ? 1 : 0);
  });
}

}  // namespace cmpihost
