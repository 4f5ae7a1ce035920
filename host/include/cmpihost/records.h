// What the broker records: the calls a provider made, its trace and log messages, and what it
// handed to a result.
#pragma once

#include <cmpihost/value.h>

#include <cstdint>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

namespace cmpihost {

/// One call of a broker or object function, made by the provider. The host's own work (building
/// inputs, snapshotting results) is not recorded, nor are the OS services of CMPIBrokerExtFT,
/// which do not receive the broker.
///
/// `args` are the arguments as text, without the broker pointer and without trailing
/// `CMPIStatus* rc` outputs: strings as they are ("(null)" for a null char*), objects as a short
/// stable description (an object path as its text, an instance as "instance of Class", a string
/// as its quoted text, "NULL" for a null pointer, "<CMPIInstance with null handle>" ...),
/// values as Value::toString() writes them, types as typeName() writes them, property lists as
/// {a, b} or NULL.
struct CallRecord {
  std::string table;     ///< the function table, e.g. "CMPIBrokerEncFT", "CMPIInstanceFT"
  std::string function;  ///< the slot name, e.g. "newObjectPath", "setProperty"
  std::vector<std::string> args;
  std::uint64_t requestId = 0;  ///< the request current on the calling thread; 0 for none

  /// "CMPIBrokerEncFT.newObjectPath(root/cimv2, KESTA_BlueLight)".
  std::string toString() const;
};

bool operator==(const CallRecord& a, const CallRecord& b);
bool operator!=(const CallRecord& a, const CallRecord& b);
std::ostream& operator<<(std::ostream& out, const CallRecord& call);

/// One trace message (CMTraceMessage).
struct TraceRecord {
  int level = 0;
  std::optional<std::string> component;  ///< nullopt for a null component
  /// The text argument; when that is null, the text of the CMPIString argument; nullopt when
  /// both are null (or the string's handle is null).
  std::optional<std::string> text;
  bool textFromString = false;  ///< true when `text` came from the CMPIString argument
  std::uint64_t requestId = 0;

  std::string toString() const;
};

bool operator==(const TraceRecord& a, const TraceRecord& b);
bool operator!=(const TraceRecord& a, const TraceRecord& b);
std::ostream& operator<<(std::ostream& out, const TraceRecord& trace);

/// One log message (CMLogMessage); the fields mean what they mean in TraceRecord.
struct LogRecord {
  int severity = 0;
  std::optional<std::string> id;
  std::optional<std::string> text;
  bool textFromString = false;
  std::uint64_t requestId = 0;

  std::string toString() const;
};

bool operator==(const LogRecord& a, const LogRecord& b);
bool operator!=(const LogRecord& a, const LogRecord& b);
std::ostream& operator<<(std::ostream& out, const LogRecord& log);

/// What a result function was called for.
enum class ResultKind {
  Instance,    ///< returnInstance
  ObjectPath,  ///< returnObjectPath
  Data,        ///< returnData
  Done,        ///< returnDone
  Error        ///< returnError
};

/// Whether the object handed to a result could be read.
enum class ObjectState {
  Valid,        ///< read into `value`
  NullPointer,  ///< the provider passed a null pointer
  NullHandle    ///< the object's handle was null
};

const char* toString(ResultKind kind);
const char* toString(ObjectState state);

/// One hand-over to a result, in the order the provider made them.
struct ResultEvent {
  ResultKind kind = ResultKind::Done;
  ObjectState state = ObjectState::Valid;
  /// Instance: a CMPI_instance value; ObjectPath: a CMPI_ref value; Data: the value handed over.
  /// Null for Done, Error and objects that could not be read.
  Value value;
  std::uint64_t requestId = 0;

  /// The instance for a valid Instance event, else null.
  const InstanceValue* instance() const;
  /// The path for a valid ObjectPath event, else null.
  const ObjectPathValue* path() const;

  std::string toString() const;
};

bool operator==(const ResultEvent& a, const ResultEvent& b);
bool operator!=(const ResultEvent& a, const ResultEvent& b);
std::ostream& operator<<(std::ostream& out, const ResultEvent& event);

}  // namespace cmpihost
