#include "logging/LogFormat.h"

#include <syslog.h>

#include <charconv>
#include <string>

#include "KestaCommonBase.h"

namespace Kesta {
namespace platform {

namespace {

void appendOneLine(std::string& out, std::string_view text) {
  // Whole runs without a line break are appended at once: this runs for every log line, and
  // character by character it cost more than the rest of the line's formatting together.
  std::size_t start = 0;
  for (std::size_t i = 0; i < text.size(); ++i) {
    const char c = text[i];
    if (c == '\n' || c == '\r') {
      out.append(text.data() + start, i - start);
      out += c == '\n' ? "\\n" : "\\r";
      start = i + 1;
    }
  }
  out.append(text.data() + start, text.size() - start);
}

const char* kindWord(LineKind kind) { return kind == LineKind::kLog ? "LOG" : "TRACE"; }

// "<category><separator><level><separator><LOG|TRACE><separator><text>", on one line.
std::string joinFields(std::string_view category, int level, LineKind kind, std::string_view text,
                       char separator) {
  std::string line;
  line.reserve(category.size() + text.size() + 24);
  appendOneLine(line, category);
  line.push_back(separator);
  line += std::to_string(level);
  line.push_back(separator);
  line += kindWord(kind);
  line.push_back(separator);
  appendOneLine(line, text);
  return line;
}

}  // namespace

std::string formatLogLine(std::string_view category, int level, LineKind kind,
                          std::string_view text) {
  return joinFields(category, level, kind, text, '\t') + '\n';
}

std::string formatSyslogMessage(std::string_view category, int level, LineKind kind,
                                std::string_view text) {
  return joinFields(category, level, kind, text, ' ');
}

int syslogPriority(int level, LineKind kind) {
  if (kind == LineKind::kTrace) {
    return LOG_DEBUG;
  }
  if (level >= 6000) {
    return LOG_ERR;
  }
  if (level >= 5000) {
    return LOG_WARNING;
  }
  if (level >= 4000) {
    return LOG_NOTICE;
  }
  if (level >= 3000) {
    return LOG_INFO;
  }
  return LOG_DEBUG;
}

std::optional<int> parseLogThreshold(std::string_view text) {
  const std::string stripped = Kesta::stripSpaces(std::string(text));
  std::string_view digits = stripped;
  // from_chars takes a minus sign but not a plus sign; accept both.
  if (!digits.empty() && digits.front() == '+') {
    digits.remove_prefix(1);
    if (!digits.empty() && digits.front() == '-') {
      return std::nullopt;
    }
  }
  int value = 0;
  const auto [end, error] = std::from_chars(digits.data(), digits.data() + digits.size(), value);
  if (digits.empty() || error != std::errc() || end != digits.data() + digits.size()) {
    return std::nullopt;
  }
  return value;
}

}  // namespace platform
}  // namespace Kesta
