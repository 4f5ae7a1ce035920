// A Request is one CIM operation, the unit that owns broker objects.
//
// While a Request is alive it is the "current request" of the thread that made it: everything the
// broker creates on that thread belongs to it and is freed when it ends. It also provides what an
// object manager passes to a provider (the CMPIContext and CMPIResult) and builds the inputs of
// the call (object paths, property lists, strings) so that they live exactly as long as the
// request. What the provider hands to the result is kept as values and stays readable after the
// request ended (see results(), or the driver functions, which return it all in an Outcome).
#pragma once

#include <cmpift.h>
#include <cmpihost/records.h>
#include <cmpihost/value.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace cmpihost {

class Broker;

namespace detail {
class RequestState;
class ObjectScope;
}  // namespace detail

/// An optional C string argument: nullopt is passed as a null `const char*`.
using OptionalText = std::optional<std::string>;
/// A property list argument: nullopt is a null list (all properties), an empty vector an empty
/// list (no properties besides keys), otherwise the names.
using PropertyList = std::optional<std::vector<std::string>>;

/// What the request's context holds.
struct RequestOptions {
  /// The CMPIInitNameSpace entry of the context.
  std::string nameSpace = "root/cimv2";
  /// The CMPIInvocationFlags entry of the context.
  CMPIFlags invocationFlags = 0;
  /// The CMPIPrincipal entry of the context; nullopt leaves the entry out.
  OptionalText principal = std::string("cmpihost");
};

/// One CIM operation. Must be created and destroyed on the same thread (ending it elsewhere
/// aborts the process, since the making thread would be left with a dangling current request),
/// and must end before its Broker. Not copyable or movable: the provider holds pointers into it.
class Request {
 public:
  explicit Request(Broker& broker, RequestOptions options = {});
  ~Request();
  Request(const Request&) = delete;
  Request& operator=(const Request&) = delete;
  Request(Request&&) = delete;
  Request& operator=(Request&&) = delete;

  /// Unique per broker, counting from 1; calls and results record it.
  std::uint64_t id() const;
  Broker& broker() const;
  const RequestOptions& options() const;

  /// The context and result to pass to the provider. They stay valid for the whole request: a
  /// provider's CMRelease on them is accepted and does nothing.
  CMPIContext* context() const;
  CMPIResult* result() const;

  // ---- Inputs, owned by this request (built directly, not recorded, never faulted) ---------

  CMPIObjectPath* objectPath(const ObjectPathValue& path);
  /// A path of `className` in the request's namespace, without keys.
  CMPIObjectPath* classPath(const std::string& className);
  CMPIInstance* instance(const InstanceValue& instance);
  CMPIString* string(const std::string& text);
  /// A null-terminated name list (null for nullopt) that lives as long as the request.
  const char** propertyList(const PropertyList& properties);
  /// The text as a C string that lives as long as the request; null for nullopt.
  const char* text(const OptionalText& text);
  /// Adds or replaces an entry of the context.
  void addContextEntry(const std::string& name, const Value& value);

  // ---- What happened ------------------------------------------------------------------------

  /// Everything handed to the result so far, in order (recorded also when recording is off).
  std::vector<ResultEvent> results() const;
  /// How often returnDone was called.
  std::size_t doneCount() const;
  /// The calls, traces and logs made while this request was current (only while recording).
  std::vector<CallRecord> calls() const;
  std::vector<TraceRecord> traces() const;
  std::vector<LogRecord> logs() const;
  /// Objects owned by this request that are alive now.
  std::size_t liveObjectCount() const;

  /// The implementation; for the host's own sources.
  detail::RequestState& state() const { return *state_; }

 private:
  Broker* broker_;
  std::unique_ptr<detail::RequestState> state_;
};

/// Makes a request current on this thread for its lifetime (for work that a provider does on a
/// thread of its own); the previous current request comes back afterwards. The request must
/// outlive the guard.
class ScopeGuard {
 public:
  explicit ScopeGuard(Request& request);
  ~ScopeGuard();
  ScopeGuard(const ScopeGuard&) = delete;
  ScopeGuard& operator=(const ScopeGuard&) = delete;

 private:
  detail::ObjectScope* activated_;
};

}  // namespace cmpihost
