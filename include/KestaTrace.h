// Diagnostics shared by every unit of the module: the message types, the two trace formatters,
// the emission of one message to the logger (log level first, then trace level), the pointer
// inserter for parameter lists, and the module's exception type.
#ifndef KESTA_TRACE_H
#define KESTA_TRACE_H

#include <cstdio>
#include <cstring>
#include <exception>
#include <ostream>
#include <string>
#include <type_traits>
#include <utility>

#include "VNLog.h"

namespace Kesta {

// Selects the format of a trace line.
enum MessageType {
  ENTERING = 0,
  EXITING = 1,
  METHOD = 2,
  MESSAGE = 3,
};

// Size of the formatters' buffers; longer texts are cut to one byte less than this.
constexpr std::size_t kMessageBufferSize = 512;

namespace detail {

// printf must never see a null %s argument.
inline const char* orNull(const char* text) { return text != nullptr ? text : "(null)"; }

}  // namespace detail

// Formats a trace line without a parameter list. `text` is the function name for ENTERING,
// EXITING and METHOD, and the message for MESSAGE. The result lives in a buffer owned by this
// formatter (one per thread, so that concurrent operations never see each other's text) and is
// overwritten by the next call on the same thread. A type outside the four yields "".
inline char* trace(const char* file, const char* text, unsigned int line, MessageType type) {
  static thread_local char messageBuffer[kMessageBufferSize];
  std::memset(messageBuffer, 0, sizeof messageBuffer);
  const int lineNumber = static_cast<int>(line);
  switch (type) {
    case ENTERING:
      std::snprintf(messageBuffer, sizeof messageBuffer, "ENTERING: %s() in %s [Line: %d]",
                    detail::orNull(text), detail::orNull(file), lineNumber);
      break;
    case EXITING:
      std::snprintf(messageBuffer, sizeof messageBuffer, "EXITING: %s() in %s [Line: %d]",
                    detail::orNull(text), detail::orNull(file), lineNumber);
      break;
    case METHOD:
      std::snprintf(messageBuffer, sizeof messageBuffer,
                    "METHOD: %s() was invoked in %s [Line: %d]", detail::orNull(text),
                    detail::orNull(file), lineNumber);
      break;
    case MESSAGE:
      std::snprintf(messageBuffer, sizeof messageBuffer, "MESSAGE [File: %s, Line: %d]: %s",
                    detail::orNull(file), lineNumber, detail::orNull(text));
      break;
  }
  return messageBuffer;
}

// As trace(), with the parameter list appended. Its buffer is separate from trace()'s.
inline char* tracepara(const char* file, const char* text, unsigned int line,
                       const char* parameters, MessageType type) {
  static thread_local char messageBuffer[kMessageBufferSize];
  std::memset(messageBuffer, 0, sizeof messageBuffer);
  const int lineNumber = static_cast<int>(line);
  switch (type) {
    case ENTERING:
      std::snprintf(messageBuffer, sizeof messageBuffer,
                    "ENTERING: %s() in %s [Line: %d],Parameters List: %s", detail::orNull(text),
                    detail::orNull(file), lineNumber, detail::orNull(parameters));
      break;
    case EXITING:
      std::snprintf(messageBuffer, sizeof messageBuffer,
                    "EXITING: %s() in %s [Line: %d],Parameters List: %s", detail::orNull(text),
                    detail::orNull(file), lineNumber, detail::orNull(parameters));
      break;
    case METHOD:
      std::snprintf(messageBuffer, sizeof messageBuffer,
                    "METHOD: %s() was invoked in %s [Line: %d],Parameters List: %s",
                    detail::orNull(text), detail::orNull(file), lineNumber,
                    detail::orNull(parameters));
      break;
    case MESSAGE:
      std::snprintf(messageBuffer, sizeof messageBuffer,
                    "MESSAGE [File: %s, Line: %d]: %s,Parameters List: %s", detail::orNull(file),
                    lineNumber, detail::orNull(text), detail::orNull(parameters));
      break;
  }
  return messageBuffer;
}

// Writes a pointer into a parameter list the way a standard stream prints a const void*.
// Character pointers are texts, not addresses: they keep the buffer's own inserter.
template <typename T, typename = std::enable_if_t<!std::is_same_v<std::remove_cv_t<T>, char>>>
std::ostream& operator<<(VNLog::VNMessageBuffer& buffer, T* pointer) {
  std::ostream& stream = buffer;
  return stream << static_cast<const void*>(pointer);
}

// Sends one message with a parameter list to the logger: formatted with tracepara() and written
// at log level, then the parameter list is built and formatted afresh and written at trace
// level. `writeParameters(VNLog::VNMessageBuffer&)` writes the list: for each argument a blank,
// its key ending in "=", and its value. Nothing is formatted when the logger would drop the line.
template <typename ParameterWriter>
void emitTracePara(const char* function, const char* file, int line, const std::string& category,
                   int level, MessageType type, ParameterWriter&& writeParameters) {
  if (!VNLog::VNLogger::isEnabled(level)) return;
  // The formatted line is handed to the logger as a string straight away: collecting it in a
  // second message buffer first would only copy it through a string stream.
  VNLog::VNMessageBuffer parameters;

  writeParameters(parameters);
  std::string list = VNLog::VNMessageBuffer::str(parameters);
  std::string text(tracepara(file, function, static_cast<unsigned int>(line), list.c_str(), type));
  VNLog::VNLogger::logLevelMessage(function, file, line, category, level, nullptr, 0, 0, text);

  writeParameters(parameters);
  list = VNLog::VNMessageBuffer::str(parameters);
  text.assign(tracepara(file, function, static_cast<unsigned int>(line), list.c_str(), type));
  VNLog::VNLogger::traceLevelMessage(function, file, line, category, level, nullptr, 0, 0, text);
}

// The function and source line that a line is written for. A helper that writes the entry and
// exit lines of the function calling it takes them from that function (KESTA_TRACE_SITE), so
// that the lines name the function that was called, not the helper.
struct TraceSite {
  const char* function;
  int line;
};

// As emitTracePara(), for the function and line of `site`.
template <typename ParameterWriter>
void emitTracePara(const TraceSite& site, const char* file, const std::string& category, int level,
                   MessageType type, ParameterWriter&& writeParameters) {
  emitTracePara(site.function, file, site.line, category, level, type,
                std::forward<ParameterWriter>(writeParameters));
}

// As emitTracePara() without a parameter list; `text` as for trace().
inline void emitTrace(const char* function, const char* file, int line, const std::string& category,
                      int level, MessageType type, const char* text) {
  if (!VNLog::VNLogger::isEnabled(level)) return;
  std::string formatted(trace(file, text, static_cast<unsigned int>(line), type));
  VNLog::VNLogger::logLevelMessage(function, file, line, category, level, nullptr, 0, 0, formatted);
  formatted.assign(trace(file, text, static_cast<unsigned int>(line), type));
  VNLog::VNLogger::traceLevelMessage(function, file, line, category, level, nullptr, 0, 0,
                                     formatted);
}

// Level of entry, exit and informational lines.
constexpr int kTraceLevel = 3000;
// Level of the lines that report a failed enumeration through the broker.
constexpr int kFailureTraceLevel = 6000;

// The exception of the module. It is thrown and caught only inside the instrumentation collector.
class ProviderException : public std::exception {
 public:
  explicit ProviderException(const char* message) : message_(message != nullptr ? message : "") {}
  ProviderException(const ProviderException& other) = default;
  ProviderException(ProviderException&& other) = default;
  ProviderException& operator=(const ProviderException& other) = default;
  ProviderException& operator=(ProviderException&& other) = default;
  ~ProviderException() override = default;

  const char* what() const noexcept override { return message_.c_str(); }

 private:
  std::string message_;
};

}  // namespace Kesta

// Entry, exit and message lines of the calling function. Each unit defines `kSourceFile`, the
// name of its source file as it appears in the lines.
#define KESTA_TRACE_PARA(category, level, type, writer) \
  ::Kesta::emitTracePara(__func__, kSourceFile, __LINE__, (category), (level), (type), (writer))
#define KESTA_TRACE(category, level, type, text) \
  ::Kesta::emitTrace(__func__, kSourceFile, __LINE__, (category), (level), (type), (text))
// The calling function and line, for a helper that traces on its behalf.
#define KESTA_TRACE_SITE \
  ::Kesta::TraceSite { __func__, __LINE__ }

#endif  // KESTA_TRACE_H
