#include <cmpihost/records.h>

#include <cmpihost/status.h>

#include "text.h"

namespace cmpihost {

namespace {

std::string optionalText(const std::optional<std::string>& text) {
  return text ? detail::quoted(*text) : std::string("NULL");
}

std::string requestSuffix(std::uint64_t requestId) {
  return requestId != 0 ? " [request " + std::to_string(requestId) + "]" : std::string();
}

}  // namespace

std::string CallRecord::toString() const {
  std::string text = table + "." + function + "(";
  for (std::size_t i = 0; i < args.size(); ++i) {
    if (i != 0) text += ", ";
    text += args[i];
  }
  return text + ")" + requestSuffix(requestId);
}

bool operator==(const CallRecord& a, const CallRecord& b) {
  return a.table == b.table && a.function == b.function && a.args == b.args &&
         a.requestId == b.requestId;
}
bool operator!=(const CallRecord& a, const CallRecord& b) { return !(a == b); }
std::ostream& operator<<(std::ostream& out, const CallRecord& call) {
  return out << call.toString();
}

std::string TraceRecord::toString() const {
  return "trace level " + std::to_string(level) + " component " + optionalText(component) +
         " text " + optionalText(text) + (textFromString ? " (from string)" : "") +
         requestSuffix(requestId);
}

bool operator==(const TraceRecord& a, const TraceRecord& b) {
  return a.level == b.level && a.component == b.component && a.text == b.text &&
         a.textFromString == b.textFromString && a.requestId == b.requestId;
}
bool operator!=(const TraceRecord& a, const TraceRecord& b) { return !(a == b); }
std::ostream& operator<<(std::ostream& out, const TraceRecord& trace) {
  return out << trace.toString();
}

std::string LogRecord::toString() const {
  return "log severity " + std::to_string(severity) + " id " + optionalText(id) + " text " +
         optionalText(text) + (textFromString ? " (from string)" : "") + requestSuffix(requestId);
}

bool operator==(const LogRecord& a, const LogRecord& b) {
  return a.severity == b.severity && a.id == b.id && a.text == b.text &&
         a.textFromString == b.textFromString && a.requestId == b.requestId;
}
bool operator!=(const LogRecord& a, const LogRecord& b) { return !(a == b); }
std::ostream& operator<<(std::ostream& out, const LogRecord& log) { return out << log.toString(); }

const char* toString(ResultKind kind) {
  switch (kind) {
    case ResultKind::Instance:
      return "Instance";
    case ResultKind::ObjectPath:
      return "ObjectPath";
    case ResultKind::Data:
      return "Data";
    case ResultKind::Done:
      return "Done";
    case ResultKind::Error:
      return "Error";
  }
  return "?";
}

const char* toString(ObjectState state) {
  switch (state) {
    case ObjectState::Valid:
      return "Valid";
    case ObjectState::NullPointer:
      return "NullPointer";
    case ObjectState::NullHandle:
      return "NullHandle";
  }
  return "?";
}

const InstanceValue* ResultEvent::instance() const {
  if (kind != ResultKind::Instance || state != ObjectState::Valid || value.isNull() ||
      value.type() != CMPI_instance) {
    return nullptr;
  }
  return &value.asInstance();
}

const ObjectPathValue* ResultEvent::path() const {
  if (kind != ResultKind::ObjectPath || state != ObjectState::Valid || value.isNull() ||
      value.type() != CMPI_ref) {
    return nullptr;
  }
  return &value.asReference();
}

std::string ResultEvent::toString() const {
  std::string text = cmpihost::toString(kind);
  if (state != ObjectState::Valid) {
    text += std::string(" ") + cmpihost::toString(state);
  } else if (kind != ResultKind::Done && kind != ResultKind::Error) {
    text += " " + value.toString();
  }
  return text + requestSuffix(requestId);
}

bool operator==(const ResultEvent& a, const ResultEvent& b) {
  return a.kind == b.kind && a.state == b.state && a.value == b.value && a.requestId == b.requestId;
}
bool operator!=(const ResultEvent& a, const ResultEvent& b) { return !(a == b); }
std::ostream& operator<<(std::ostream& out, const ResultEvent& event) {
  return out << event.toString();
}

}  // namespace cmpihost
