// CMPIResult: everything handed over is snapshotted into values at once, so the objects may die
// with the request while the test still reads the results.
#include <cmpihost/convert.h>
#include <cmpihost/status.h>

#include "broker_core.h"
#include "objects.h"
#include "request_state.h"
#include "table_support.h"
#include "value_bridge.h"

namespace cmpihost::detail {

namespace {

using Args = std::vector<std::string>;
constexpr const char* kTable = ResultObject::kTableName;

ObjectState stateOf(const void* object) {
  if (object == nullptr) return ObjectState::NullPointer;
  // Every encapsulated struct starts with its handle.
  return *static_cast<void* const*>(object) == nullptr ? ObjectState::NullHandle
                                                       : ObjectState::Valid;
}

// The status for an object that could not be read; the event is recorded all the same.
CMPIStatus statusFor(BrokerCore* core, ObjectState state, const char* function) {
  switch (state) {
    case ObjectState::Valid:
      return okStatus();
    case ObjectState::NullPointer:
      return failure(core, CMPI_RC_ERR_INVALID_PARAMETER,
                     std::string(kTable) + "." + function + ": the object is NULL");
    case ObjectState::NullHandle:
      return failure(core, CMPI_RC_ERR_INVALID_HANDLE,
                     std::string(kTable) + "." + function + ": the object has a null handle");
  }
  return okStatus();
}

void deliver(const Entered<ResultObject>& call, ResultEvent event) {
  call.core->addResult(call.self->request(), std::move(event));
}

CMPIStatus resultRelease(CMPIResult* result) { return releaseObject<ResultObject>(result); }

// A copy of a result delivers to the same request: it is another handle on the same output.
CMPIResult* resultClone(const CMPIResult* result, CMPIStatus* rc) {
  return cloneObject<ResultObject>(result, rc);
}

CMPIStatus resultReturnData(const CMPIResult* result, const CMPIValue* value, const CMPIType type) {
  const auto call = enter<ResultObject>(result, "returnData", [&](Args& args) {
    args.push_back(describeValue(value, type));
    args.push_back(typeName(type));
  });
  if (!call.usable()) return invalidHandle(call.core, kTable, "returnData");
  ResultEvent event;
  event.kind = ResultKind::Data;
  ReadValue read = readValue(value, type);
  CMPIStatus status = okStatus();
  if (read.ok()) {
    event.value = std::move(read.value);
  } else {
    event.value = Value::null(type);
    if (read.rc == CMPI_RC_ERR_INVALID_PARAMETER) event.state = ObjectState::NullPointer;
    if (read.rc == CMPI_RC_ERR_INVALID_HANDLE) event.state = ObjectState::NullHandle;
    status = failure(call.core, read.rc, std::string(kTable) + ".returnData: " + read.error);
  }
  deliver(call, std::move(event));
  return status;
}

CMPIStatus resultReturnInstance(const CMPIResult* result, const CMPIInstance* instance) {
  const auto call = enter<ResultObject>(
      result, "returnInstance", [&](Args& args) { args.push_back(describeObject(instance)); });
  if (!call.usable()) return invalidHandle(call.core, kTable, "returnInstance");
  ResultEvent event;
  event.kind = ResultKind::Instance;
  event.state = stateOf(instance);
  if (event.state == ObjectState::Valid) {
    std::optional<InstanceValue> value = toInstanceValue(instance);
    if (value) {
      event.value = Value::instance(std::move(*value));
    } else {
      event.state = ObjectState::NullHandle;
    }
  }
  const ObjectState state = event.state;
  deliver(call, std::move(event));
  return statusFor(call.core, state, "returnInstance");
}

CMPIStatus resultReturnObjectPath(const CMPIResult* result, const CMPIObjectPath* path) {
  const auto call = enter<ResultObject>(result, "returnObjectPath",
                                        [&](Args& args) { args.push_back(describeObject(path)); });
  if (!call.usable()) return invalidHandle(call.core, kTable, "returnObjectPath");
  ResultEvent event;
  event.kind = ResultKind::ObjectPath;
  event.state = stateOf(path);
  if (event.state == ObjectState::Valid) {
    std::optional<ObjectPathValue> value = toObjectPathValue(path);
    if (value) {
      event.value = Value::reference(std::move(*value));
    } else {
      event.state = ObjectState::NullHandle;
    }
  }
  const ObjectState state = event.state;
  deliver(call, std::move(event));
  return statusFor(call.core, state, "returnObjectPath");
}

CMPIStatus resultReturnDone(const CMPIResult* result) {
  const auto call = enter<ResultObject>(result, "returnDone");
  if (!call.usable()) return invalidHandle(call.core, kTable, "returnDone");
  ResultEvent event;
  event.kind = ResultKind::Done;
  deliver(call, std::move(event));
  return okStatus();
}

CMPIStatus resultReturnError(const CMPIResult* result, const CMPIError* error) {
  const auto call = enter<ResultObject>(result, "returnError", [&](Args& args) {
    args.push_back(error == nullptr        ? "NULL"
                   : error->hdl == nullptr ? "<CMPIError with null handle>"
                                           : "error");
  });
  if (!call.usable()) return invalidHandle(call.core, kTable, "returnError");
  ResultEvent event;
  event.kind = ResultKind::Error;
  event.state = stateOf(error);
  const ObjectState state = event.state;
  deliver(call, std::move(event));
  return statusFor(call.core, state, "returnError");
}

CMPIResultFT resultTable = {CMPICurrentVersion, resultRelease,        resultClone,
                            resultReturnData,   resultReturnInstance, resultReturnObjectPath,
                            resultReturnDone,   resultReturnError};

}  // namespace

CMPIResultFT* ResultObject::table() { return &resultTable; }

ResultObject::ResultObject(ObjectScope& scope, RequestState* request)
    : Encapsulated(scope), request_(request) {}

}  // namespace cmpihost::detail
