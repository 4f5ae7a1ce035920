// What every table function of the host does on entry and on failure: find the object, record
// the call, and build statuses and empty CMPIData values.
#pragma once

#include <cmpift.h>
#include <cmpihost/faults.h>

#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include "broker_core.h"
#include "fault_injector.h"
#include "object_scope.h"

namespace cmpihost::detail {

// ---- Descriptions for the recorder ------------------------------------------------------------

/// A short, stable description of any encapsulated object: "NULL", the quoted text of a string,
/// the text of a path, "instance of Class", "array of CMPI_uint16[3]", "enumeration(2)",
/// "context", "result", "args(1)", a date/time's text, "<CMPIInstance with null handle>", or
/// "<foreign object>" for objects of another broker.
std::string describeObject(const void* object);
/// {a, b} for a list, NULL for a null list.
std::string describeList(const char** list);
/// The value a setter received, as Value::toString() writes it; "<unreadable ...>" when it
/// cannot be read.
std::string describeValue(const CMPIValue* value, CMPIType type);

// ---- Statuses and data ------------------------------------------------------------------------

inline CMPIStatus okStatus() { return CMPIStatus{CMPI_RC_OK, nullptr}; }

/// A failure status; its message is a new string when a broker is known.
CMPIStatus failure(BrokerCore* core, CMPIrc rc, const std::string& message);

inline void setRc(CMPIStatus* rc, const CMPIStatus& status) {
  if (rc != nullptr) *rc = status;
}

/// The failure for a null object pointer or an object with a null handle.
CMPIStatus invalidHandle(BrokerCore* core, const char* table, const char* function);

/// A CMPIData with no value: type `type`, state null plus `extraState`.
inline CMPIData nullData(CMPIType type = CMPI_null, CMPIValueState extraState = 0) {
  CMPIData data{};
  data.type = type;
  data.state = static_cast<CMPIValueState>(CMPI_nullValue | extraState);
  data.value.uint64 = 0;
  return data;
}

// ---- Entering a table function ----------------------------------------------------------------

/// The object a table function was called on, and its broker. Lives as long as the table
/// function's call: when an InvalidateHandle fault fired for the call, the object loses its
/// handle as this ends, after the function has done its work.
template <class Self>
struct Entered {
  Self* self = nullptr;        // null when the pointer was null or not of this type
  BrokerCore* core = nullptr;  // null when no broker can be found at all

  Entered() = default;
  Entered(Entered&& other) noexcept
      : self(other.self),
        core(other.core),
        invalidateOnExit(std::exchange(other.invalidateOnExit, false)) {}
  Entered(const Entered&) = delete;
  Entered& operator=(const Entered&) = delete;
  Entered& operator=(Entered&&) = delete;
  ~Entered() {
    if (invalidateOnExit && self != nullptr) self->clearHandle();
  }

  bool usable() const { return self != nullptr && self->hasHandle(); }

  bool invalidateOnExit = false;
};

/// Looks up the object and records the call. `moreArgs(args)` appends the arguments after the
/// object's description; it runs only while recording. A call on an object of ours is also
/// shown to the InvalidateHandle faults (release never is: it frees the object).
template <class Self, class MoreArgs>
Entered<Self> enter(const typename Self::CmpiType* object, const char* function,
                    MoreArgs&& moreArgs) {
  Entered<Self> entered;
  entered.self = Self::from(object);
  entered.core = entered.self != nullptr ? &entered.self->core() : BrokerCore::currentOnThread();
  if (entered.core != nullptr) {
    entered.core->recordCall(Self::kTableName, function, [&] {
      std::vector<std::string> args;
      args.push_back(describeObject(object));
      moreArgs(args);
      return args;
    });
  }
  if (entered.self != nullptr && entered.self->hasHandle() &&
      std::strcmp(function, "release") != 0) {
    entered.invalidateOnExit = entered.core->faults().onObjectCall(Self::kTableName, function);
  }
  return entered;
}

template <class Self>
Entered<Self> enter(const typename Self::CmpiType* object, const char* function) {
  return enter<Self>(object, function, [](std::vector<std::string>&) {});
}

/// Looks up the broker behind `broker` and records a call of one of its functions; null when
/// `broker` is null or not of this host (nothing is recorded then).
template <class MoreArgs>
BrokerCore* enterBroker(const CMPIBroker* broker, const char* table, const char* function,
                        MoreArgs&& moreArgs) {
  BrokerCore* core = BrokerCore::from(broker);
  if (core != nullptr) {
    core->recordCall(table, function, [&] {
      std::vector<std::string> args;
      moreArgs(args);
      return args;
    });
  }
  return core;
}

/// The failure of a broker function called with a null or foreign broker.
inline CMPIStatus invalidBroker() { return CMPIStatus{CMPI_RC_ERR_INVALID_HANDLE, nullptr}; }

/// What a creating function returns when a fault fires: null, a blank object of the type whose
/// handle is null (made in `scope`), or null with *rc set to the fault's status.
template <class Self>
typename Self::CmpiType* faultedResult(BrokerCore& core, const FaultDecision& decision,
                                       ObjectScope& scope, CMPIStatus* rc) {
  switch (decision.kind) {
    case FaultKind::NullResult:
      return nullptr;
    case FaultKind::NullHandle: {
      Self* object = Self::blank(scope);
      object->clearHandle();
      return object->cmpi();
    }
    case FaultKind::ErrorStatus:
      setRc(rc, core.makeStatus(decision.status));
      return nullptr;
    case FaultKind::InvalidateHandle:  // never decided for a creating function
      return nullptr;
  }
  return nullptr;
}

/// The release slot of every type: frees the object now (pinned objects stay and still report
/// success). A null pointer or a null handle fails with CMPI_RC_ERR_INVALID_HANDLE; an object
/// with a null handle is left for its scope to free.
template <class Self>
CMPIStatus releaseObject(typename Self::CmpiType* object) {
  const Entered<Self> call = enter<Self>(object, "release");
  if (!call.usable()) return invalidHandle(call.core, Self::kTableName, "release");
  call.self->scope().destroy(call.self);
  return okStatus();
}

/// The clone slot of every type that can be cloned: a deep copy owned by the scope of the
/// original. Counted as CreatingFunction::Clone.
template <class Self>
typename Self::CmpiType* cloneObject(const typename Self::CmpiType* object, CMPIStatus* rc) {
  const Entered<Self> call = enter<Self>(object, "clone");
  if (call.core != nullptr) {
    const FaultDecision fault = call.core->faults().onCall(CreatingFunction::Clone);
    if (fault.fire) {
      ObjectScope& scope = call.self != nullptr ? call.self->scope() : call.core->targetScope();
      return faultedResult<Self>(*call.core, fault, scope, rc);
    }
  }
  if (!call.usable()) {
    setRc(rc, invalidHandle(call.core, Self::kTableName, "clone"));
    return nullptr;
  }
  Self* copy = call.self->cloneInto(call.self->scope());
  setRc(rc, okStatus());
  return copy->cmpi();
}

}  // namespace cmpihost::detail
