// CMPIBrokerEncFT: the factories of the encapsulated types and the helpers (type tests, messages,
// logging and tracing).
#include <cmpihost/convert.h>
#include <cmpihost/status.h>

#include <cstdarg>
#include <cstdio>

#include "broker_core.h"
#include "datetime.h"
#include "objects.h"
#include "table_support.h"
#include "text.h"
#include "value_bridge.h"

namespace cmpihost::detail {

namespace {

using Args = std::vector<std::string>;
constexpr const char* kTable = "CMPIBrokerEncFT";

// A provider that passes a garbage size must get an error, not an allocation that fails deep
// inside the broker.
constexpr CMPICount kMaxArraySize = 1u << 24;

CMPIStatus fail(BrokerCore* core, CMPIrc rc, const char* function, const std::string& what) {
  return failure(core, rc, std::string(kTable) + "." + function + ": " + what);
}

// The start of every factory: find the broker (recording the call), count the call and let an
// armed fault decide. Returns false when the factory must return at once with `*result`.
template <class Self, class MoreArgs>
bool enterFactory(const CMPIBroker* broker, const char* function, CreatingFunction creating,
                  CMPIStatus* rc, BrokerCore*& core, typename Self::CmpiType*& result,
                  MoreArgs&& moreArgs) {
  result = nullptr;
  core = enterBroker(broker, kTable, function, std::forward<MoreArgs>(moreArgs));
  if (core == nullptr) {
    setRc(rc, invalidBroker());
    return false;
  }
  const FaultDecision fault = core->faults().onCall(creating);
  if (fault.fire) {
    result = faultedResult<Self>(*core, fault, core->targetScope(), rc);
    return false;
  }
  return true;
}

CMPIInstance* newInstance(const CMPIBroker* broker, const CMPIObjectPath* path, CMPIStatus* rc) {
  BrokerCore* core = nullptr;
  CMPIInstance* result = nullptr;
  if (!enterFactory<InstanceObject>(broker, "newInstance", CreatingFunction::NewInstance, rc, core,
                                    result,
                                    [&](Args& args) { args.push_back(describeObject(path)); })) {
    return result;
  }
  if (path == nullptr) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "newInstance", "the object path is NULL"));
    return nullptr;
  }
  std::optional<ObjectPathValue> value = toObjectPathValue(path);
  if (!value) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_HANDLE, "newInstance",
                   "the object path has a null handle"));
    return nullptr;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<InstanceObject>(InstanceValue(std::move(*value)))->cmpi();
}

CMPIObjectPath* newObjectPath(const CMPIBroker* broker, const char* nameSpace,
                              const char* className, CMPIStatus* rc) {
  BrokerCore* core = nullptr;
  CMPIObjectPath* result = nullptr;
  if (!enterFactory<ObjectPathObject>(broker, "newObjectPath", CreatingFunction::NewObjectPath, rc,
                                      core, result, [&](Args& args) {
                                        args.push_back(textOrNull(nameSpace));
                                        args.push_back(textOrNull(className));
                                      })) {
    return result;
  }
  if (className == nullptr) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "newObjectPath", "the class name is NULL"));
    return nullptr;
  }
  // A null namespace is accepted and means "no namespace", like a local class path.
  ObjectPathValue value(nameSpace != nullptr ? nameSpace : "", className);
  setRc(rc, okStatus());
  return core->targetScope().make<ObjectPathObject>(std::move(value))->cmpi();
}

CMPIArgs* newArgs(const CMPIBroker* broker, CMPIStatus* rc) {
  BrokerCore* core = nullptr;
  CMPIArgs* result = nullptr;
  if (!enterFactory<ArgsObject>(broker, "newArgs", CreatingFunction::NewArgs, rc, core, result,
                                [](Args&) {})) {
    return result;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<ArgsObject>()->cmpi();
}

CMPIString* newString(const CMPIBroker* broker, const char* data, CMPIStatus* rc) {
  BrokerCore* core = nullptr;
  CMPIString* result = nullptr;
  if (!enterFactory<StringObject>(broker, "newString", CreatingFunction::NewString, rc, core,
                                  result, [&](Args& args) { args.push_back(textOrNull(data)); })) {
    return result;
  }
  if (data == nullptr) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "newString", "the text is NULL"));
    return nullptr;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<StringObject>(data)->cmpi();
}

bool isStorableElementType(CMPIType type) {
  switch (type) {
    case CMPI_boolean:
    case CMPI_char16:
    case CMPI_real32:
    case CMPI_real64:
    case CMPI_uint8:
    case CMPI_uint16:
    case CMPI_uint32:
    case CMPI_uint64:
    case CMPI_sint8:
    case CMPI_sint16:
    case CMPI_sint32:
    case CMPI_sint64:
    case CMPI_string:
    case CMPI_chars:
    case CMPI_dateTime:
    case CMPI_ref:
    case CMPI_instance:
      return true;
    default:
      return false;
  }
}

CMPIArray* newArray(const CMPIBroker* broker, CMPICount max, CMPIType type, CMPIStatus* rc) {
  BrokerCore* core = nullptr;
  CMPIArray* result = nullptr;
  if (!enterFactory<ArrayObject>(broker, "newArray", CreatingFunction::NewArray, rc, core, result,
                                 [&](Args& args) {
                                   args.push_back(std::to_string(max));
                                   args.push_back(typeName(type));
                                 })) {
    return result;
  }
  const auto elementType = static_cast<CMPIType>(type & ~CMPI_ARRAY);
  if (!isStorableElementType(elementType)) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_DATA_TYPE, "newArray",
                   "arrays of " + typeName(type) + " are not supported"));
    return nullptr;
  }
  if (max > kMaxArraySize) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "newArray",
                   "an array of " + std::to_string(max) + " elements is too large"));
    return nullptr;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<ArrayObject>(elementType, std::size_t{max})->cmpi();
}

CMPIDateTime* newDateTime(const CMPIBroker* broker, CMPIStatus* rc) {
  BrokerCore* core = nullptr;
  CMPIDateTime* result = nullptr;
  if (!enterFactory<DateTimeObject>(broker, "newDateTime", CreatingFunction::NewDateTime, rc, core,
                                    result, [](Args&) {})) {
    return result;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<DateTimeObject>(nowMicros(), false)->cmpi();
}

CMPIDateTime* newDateTimeFromBinary(const CMPIBroker* broker, CMPIUint64 binTime,
                                    CMPIBoolean interval, CMPIStatus* rc) {
  BrokerCore* core = nullptr;
  CMPIDateTime* result = nullptr;
  if (!enterFactory<DateTimeObject>(broker, "newDateTimeFromBinary",
                                    CreatingFunction::NewDateTimeFromBinary, rc, core, result,
                                    [&](Args& args) {
                                      args.push_back(std::to_string(binTime));
                                      args.push_back(interval != 0 ? "true" : "false");
                                    })) {
    return result;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<DateTimeObject>(binTime, interval != 0)->cmpi();
}

CMPIDateTime* newDateTimeFromChars(const CMPIBroker* broker, const char* utcTime, CMPIStatus* rc) {
  BrokerCore* core = nullptr;
  CMPIDateTime* result = nullptr;
  if (!enterFactory<DateTimeObject>(broker, "newDateTimeFromChars",
                                    CreatingFunction::NewDateTimeFromChars, rc, core, result,
                                    [&](Args& args) { args.push_back(textOrNull(utcTime)); })) {
    return result;
  }
  if (utcTime == nullptr) {
    setRc(rc,
          fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "newDateTimeFromChars", "the text is NULL"));
    return nullptr;
  }
  const std::optional<DateTimeParts> parts = parseCimDateTime(utcTime);
  if (!parts) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "newDateTimeFromChars",
                   std::string("not a CIM date/time: ") + utcTime));
    return nullptr;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<DateTimeObject>(parts->micros, parts->interval)->cmpi();
}

CMPISelectExp* newSelectExp(const CMPIBroker* broker, const char* query, const char* language,
                            CMPIArray** projection, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "newSelectExp", [&](Args& args) {
    args.push_back(textOrNull(query));
    args.push_back(textOrNull(language));
  });
  if (projection != nullptr) *projection = nullptr;
  setRc(rc, core != nullptr ? fail(core, CMPI_RC_ERR_NOT_SUPPORTED, "newSelectExp",
                                   "queries are not supported by this broker")
                            : invalidBroker());
  return nullptr;
}

CMPIBoolean classPathIsA(const CMPIBroker* broker, const CMPIObjectPath* path, const char* type,
                         CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "classPathIsA", [&](Args& args) {
    args.push_back(describeObject(path));
    args.push_back(textOrNull(type));
  });
  if (core == nullptr) {
    setRc(rc, invalidBroker());
    return 0;
  }
  if (path == nullptr || type == nullptr) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "classPathIsA",
                   path == nullptr ? "the object path is NULL" : "the type is NULL"));
    return 0;
  }
  const std::optional<ObjectPathValue> value = toObjectPathValue(path);
  if (!value) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_HANDLE, "classPathIsA",
                   "the object path has a null handle"));
    return 0;
  }
  setRc(rc, okStatus());
  return core->classIsA(value->className(), type) ? 1 : 0;
}

// The type name of an object of this host, or null for anything else.
const char* typeNameOf(const void* object) {
  struct AnyObject {
    void* hdl;
    const void* ft;
  };
  const void* ft = static_cast<const AnyObject*>(object)->ft;
  if (ft == StringObject::table()) return "CMPIString";
  if (ft == ObjectPathObject::table()) return "CMPIObjectPath";
  if (ft == InstanceObject::table()) return "CMPIInstance";
  if (ft == ArrayObject::table()) return "CMPIArray";
  if (ft == EnumerationObject::table()) return "CMPIEnumeration";
  if (ft == ContextObject::table()) return "CMPIContext";
  if (ft == ResultObject::table()) return "CMPIResult";
  if (ft == ArgsObject::table()) return "CMPIArgs";
  if (ft == DateTimeObject::table()) return "CMPIDateTime";
  return nullptr;
}

// The text toString gives: the characters of a string, the text of a path or date/time, the MOF
// form of an instance, the values of an array; a short description otherwise.
std::string objectText(const void* object) {
  if (StringObject* string = StringObject::from(static_cast<const CMPIString*>(object))) {
    return std::string(string->text());
  }
  if (InstanceObject* instance = InstanceObject::from(static_cast<const CMPIInstance*>(object))) {
    return instance->snapshot().toString();
  }
  if (ArrayObject* array = ArrayObject::from(static_cast<const CMPIArray*>(object))) {
    return array->toValue().toString();
  }
  return describeObject(object);
}

CMPIString* toStringOf(const CMPIBroker* broker, const void* object, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "toString",
                                 [&](Args& args) { args.push_back(describeObject(object)); });
  if (core == nullptr) {
    setRc(rc, invalidBroker());
    return nullptr;
  }
  if (object == nullptr || typeNameOf(object) == nullptr) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "toString",
                   object == nullptr ? "the object is NULL" : "not an object of this broker"));
    return nullptr;
  }
  if (*static_cast<void* const*>(object) == nullptr) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_HANDLE, "toString", "the object has a null handle"));
    return nullptr;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<StringObject>(objectText(object))->cmpi();
}

CMPIBoolean isOfType(const CMPIBroker* broker, const void* object, const char* type,
                     CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "isOfType", [&](Args& args) {
    args.push_back(describeObject(object));
    args.push_back(textOrNull(type));
  });
  if (core == nullptr) {
    setRc(rc, invalidBroker());
    return 0;
  }
  if (object == nullptr || type == nullptr) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "isOfType",
                   object == nullptr ? "the object is NULL" : "the type is NULL"));
    return 0;
  }
  const char* actual = typeNameOf(object);
  setRc(rc, okStatus());
  return actual != nullptr && std::string(actual) == type ? 1 : 0;
}

CMPIString* getType(const CMPIBroker* broker, const void* object, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "getType",
                                 [&](Args& args) { args.push_back(describeObject(object)); });
  if (core == nullptr) {
    setRc(rc, invalidBroker());
    return nullptr;
  }
  const char* type = object != nullptr ? typeNameOf(object) : nullptr;
  if (type == nullptr) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "getType",
                   object == nullptr ? "the object is NULL" : "not an object of this broker"));
    return nullptr;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<StringObject>(type)->cmpi();
}

// The default message with $0 ... $9 replaced by the arguments. The variadic pairs are read with
// the C types the CMFmt* macros pass; an unknown type code stops the reading, because its size
// is unknown.
std::string formatMessage(const char* defaultMessage, CMPICount count, va_list args) {
  std::vector<std::string> values;
  for (CMPICount i = 0; i < count && i < 10; ++i) {
    const int type = va_arg(args, int);
    switch (type) {
      case CMPI_sint32:
        values.push_back(std::to_string(va_arg(args, long)));
        break;
      case CMPI_uint32:
        values.push_back(std::to_string(va_arg(args, unsigned long)));
        break;
      case CMPI_sint64:
        values.push_back(std::to_string(va_arg(args, long long)));
        break;
      case CMPI_uint64:
        values.push_back(std::to_string(va_arg(args, unsigned long long)));
        break;
      case CMPI_real64:
        values.push_back(formatReal(va_arg(args, double)));
        break;
      case CMPI_boolean:
        values.emplace_back(va_arg(args, int) != 0 ? "true" : "false");
        break;
      case CMPI_chars:
        values.push_back(textOrNull(va_arg(args, const char*)));
        break;
      case CMPI_string:
        values.push_back(toText(va_arg(args, const CMPIString*)).value_or("(null)"));
        break;
      default:
        i = count;
        break;
    }
  }
  std::string out;
  for (const char* c = defaultMessage; *c != '\0'; ++c) {
    if (c[0] == '$' && c[1] >= '0' && c[1] <= '9' &&
        static_cast<std::size_t>(c[1] - '0') < values.size()) {
      out += values[static_cast<std::size_t>(c[1] - '0')];
      ++c;
    } else {
      out += *c;
    }
  }
  return out;
}

CMPIString* messageCommon(BrokerCore* core, const char* function, const char* defaultMessage,
                          CMPIStatus* rc, CMPICount count, va_list args) {
  if (core == nullptr) {
    setRc(rc, invalidBroker());
    return nullptr;
  }
  if (defaultMessage == nullptr) {
    setRc(rc, fail(core, CMPI_RC_ERR_INVALID_PARAMETER, function, "the default message is NULL"));
    return nullptr;
  }
  setRc(rc, okStatus());
  return core->targetScope().make<StringObject>(formatMessage(defaultMessage, count, args))->cmpi();
}

CMPIString* getMessage(const CMPIBroker* broker, const char* msgId, const char* defMsg,
                       CMPIStatus* rc, CMPICount count, ...) {
  BrokerCore* core = enterBroker(broker, kTable, "getMessage", [&](Args& args) {
    args.push_back(textOrNull(msgId));
    args.push_back(textOrNull(defMsg));
    args.push_back(std::to_string(count));
  });
  va_list args;
  va_start(args, count);
  CMPIString* message = messageCommon(core, "getMessage", defMsg, rc, count, args);
  va_end(args);
  return message;
}

CMPIStatus logMessage(const CMPIBroker* broker, int severity, const char* id, const char* text,
                      const CMPIString* string) {
  BrokerCore* core = enterBroker(broker, kTable, "logMessage", [&](Args& args) {
    args.push_back(std::to_string(severity));
    args.push_back(textOrNull(id));
    args.push_back(textOrNull(text));
    args.push_back(describeObject(string));
  });
  if (core == nullptr) return invalidBroker();
  LogRecord record;
  record.severity = severity;
  if (id != nullptr) record.id = id;
  if (text != nullptr) {
    record.text = text;
  } else {
    record.text = toText(string);
    record.textFromString = record.text.has_value();
  }
  core->addLog(std::move(record));
  return okStatus();
}

CMPIStatus trace(const CMPIBroker* broker, int level, const char* component, const char* text,
                 const CMPIString* string) {
  BrokerCore* core = enterBroker(broker, kTable, "trace", [&](Args& args) {
    args.push_back(std::to_string(level));
    args.push_back(textOrNull(component));
    args.push_back(textOrNull(text));
    args.push_back(describeObject(string));
  });
  if (core == nullptr) return invalidBroker();
  TraceRecord record;
  record.level = level;
  if (component != nullptr) record.component = component;
  if (text != nullptr) {
    record.text = text;
  } else {
    record.text = toText(string);
    record.textFromString = record.text.has_value();
  }
  core->addTrace(std::move(record));
  return okStatus();
}

CMPIError* newCMPIError(const CMPIBroker* broker, const char* owner, const char* msgId,
                        const char* message, const CMPIErrorSeverity severity,
                        const CMPIErrorProbableCause cause, const CMPIrc code, CMPIStatus* rc) {
  BrokerCore* core = enterBroker(broker, kTable, "newCMPIError", [&](Args& args) {
    args.push_back(textOrNull(owner));
    args.push_back(textOrNull(msgId));
    args.push_back(textOrNull(message));
    args.push_back(std::to_string(static_cast<int>(severity)));
    args.push_back(std::to_string(static_cast<int>(cause)));
    args.push_back(rcName(code));
  });
  setRc(rc, core != nullptr ? fail(core, CMPI_RC_ERR_NOT_SUPPORTED, "newCMPIError",
                                   "extended errors are not supported by this broker")
                            : invalidBroker());
  return nullptr;
}

// Message files: the host has no catalogues, so every file "opens" and getMessage2 always
// falls back to the default message, as a broker without the file would.
int messageFileToken = 0;

CMPIStatus openMessageFile(const CMPIBroker* broker, const char* msgFile,
                           CMPIMsgFileHandle* msgFileHandle) {
  BrokerCore* core = enterBroker(broker, kTable, "openMessageFile",
                                 [&](Args& args) { args.push_back(textOrNull(msgFile)); });
  if (core == nullptr) return invalidBroker();
  if (msgFileHandle == nullptr) {
    return fail(core, CMPI_RC_ERR_INVALID_PARAMETER, "openMessageFile",
                "the handle pointer is NULL");
  }
  *msgFileHandle = &messageFileToken;
  return okStatus();
}

// The handle parameters are `const CMPIMsgFileHandle` as the function table declares them.
CMPIStatus closeMessageFile(
    const CMPIBroker* broker,
    const CMPIMsgFileHandle msgFileHandle) {  // NOLINT(misc-misplaced-const)
  BrokerCore* core = enterBroker(broker, kTable, "closeMessageFile", [&](Args& args) {
    args.push_back(msgFileHandle == &messageFileToken ? "message file" : "<unknown handle>");
  });
  return core != nullptr ? okStatus() : invalidBroker();
}

CMPIString* getMessage2(const CMPIBroker* broker, const char* msgId,
                        const CMPIMsgFileHandle msgFileHandle,  // NOLINT(misc-misplaced-const)
                        const char* defMsg, CMPIStatus* rc, CMPICount count, ...) {
  BrokerCore* core = enterBroker(broker, kTable, "getMessage2", [&](Args& args) {
    args.push_back(textOrNull(msgId));
    args.push_back(msgFileHandle == &messageFileToken ? "message file" : "<unknown handle>");
    args.push_back(textOrNull(defMsg));
    args.push_back(std::to_string(count));
  });
  va_list args;
  va_start(args, count);
  CMPIString* message = messageCommon(core, "getMessage2", defMsg, rc, count, args);
  va_end(args);
  return message;
}

}  // namespace

CMPIBrokerEncFT makeFactoryTable(int version) {
  CMPIBrokerEncFT table = {version,
                           newInstance,
                           newObjectPath,
                           newArgs,
                           newString,
                           newArray,
                           newDateTime,
                           newDateTimeFromBinary,
                           newDateTimeFromChars,
                           newSelectExp,
                           classPathIsA,
                           toStringOf,
                           isOfType,
                           getType,
                           getMessage,
                           logMessage,
                           trace,
                           newCMPIError,
                           openMessageFile,
                           closeMessageFile,
                           getMessage2};
  return table;
}

bool isFactoryTableOfThisHost(const CMPIBrokerEncFT* table) {
  return table != nullptr && table->newInstance == newInstance &&
         table->newObjectPath == newObjectPath;
}

}  // namespace cmpihost::detail
