// How the logger turns one message into the text its sinks receive. Kept apart from the logger
// itself so the exact texts can be tested without a sink.
#ifndef KESTA_PLATFORM_LOGGING_LOGFORMAT_H
#define KESTA_PLATFORM_LOGGING_LOGFORMAT_H

#include <optional>
#include <string>
#include <string_view>

namespace Kesta {
namespace platform {

// The two entry points of the logger write the same message under one of these two words.
enum class LineKind { kLog, kTrace };

// The default threshold: the module's failures (6000) pass, its entry and exit lines (3000) do not.
constexpr int kDefaultLogThreshold = 6000;

// "<category>\t<level>\t<LOG|TRACE>\t<text>\n" for the file and stderr sinks. Line breaks inside
// the category or the text are written as the two characters \n (or \r), so one message is always
// exactly one line and files can be read line by line.
std::string formatLogLine(std::string_view category, int level, LineKind kind,
                          std::string_view text);

// "<category> <level> <LOG|TRACE> <text>" for syslog, which adds its own time stamp and line end.
std::string formatSyslogMessage(std::string_view category, int level, LineKind kind,
                                std::string_view text);

// The syslog priority of a message: trace copies are debug output (the module writes every
// message twice, once per kind, and syslog should not show it twice at the same priority); log
// lines map 6000 and above to LOG_ERR, 5000 to LOG_WARNING, 4000 to LOG_NOTICE, 3000 to LOG_INFO
// and anything lower to LOG_DEBUG.
int syslogPriority(int level, LineKind kind);

// The threshold written in VNLOG_LEVEL: a whole number in the range of int, blanks around it
// allowed. Nothing for any other text.
std::optional<int> parseLogThreshold(std::string_view text);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_LOGGING_LOGFORMAT_H
