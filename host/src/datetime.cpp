#include "datetime.h"

#include <chrono>
#include <cstdio>

namespace cmpihost::detail {

namespace {

constexpr CMPIUint64 kMicrosPerSecond = 1000000ULL;
constexpr CMPIUint64 kSecondsPerDay = 86400ULL;

// Days since 1970-01-01 of a civil date, and back (proleptic Gregorian calendar).
long long daysFromCivil(long long year, unsigned month, unsigned day) {
  year -= month <= 2 ? 1 : 0;
  const long long era = (year >= 0 ? year : year - 399) / 400;
  const auto yearOfEra = static_cast<unsigned>(year - era * 400);
  const unsigned dayOfYear = (153 * (month > 2 ? month - 3 : month + 9) + 2) / 5 + day - 1;
  const unsigned dayOfEra = yearOfEra * 365 + yearOfEra / 4 - yearOfEra / 100 + dayOfYear;
  return era * 146097 + static_cast<long long>(dayOfEra) - 719468;
}

void civilFromDays(long long days, long long& year, unsigned& month, unsigned& day) {
  days += 719468;
  const long long era = (days >= 0 ? days : days - 146096) / 146097;
  const auto dayOfEra = static_cast<unsigned>(days - era * 146097);
  const unsigned yearOfEra =
      (dayOfEra - dayOfEra / 1460 + dayOfEra / 36524 - dayOfEra / 146096) / 365;
  const unsigned dayOfYear = dayOfEra - (365 * yearOfEra + yearOfEra / 4 - yearOfEra / 100);
  const unsigned mp = (5 * dayOfYear + 2) / 153;
  day = dayOfYear - (153 * mp + 2) / 5 + 1;
  month = mp < 10 ? mp + 3 : mp - 9;
  year = static_cast<long long>(yearOfEra) + era * 400 + (month <= 2 ? 1 : 0);
}

bool readDigits(std::string_view text, std::size_t pos, std::size_t count, CMPIUint64& out) {
  out = 0;
  for (std::size_t i = pos; i < pos + count; ++i) {
    if (text[i] < '0' || text[i] > '9') return false;
    out = out * 10 + static_cast<CMPIUint64>(text[i] - '0');
  }
  return true;
}

}  // namespace

std::string formatCimDateTime(CMPIUint64 micros, bool interval) {
  const CMPIUint64 fraction = micros % kMicrosPerSecond;
  CMPIUint64 seconds = micros / kMicrosPerSecond;
  const CMPIUint64 second = seconds % 60;
  seconds /= 60;
  const CMPIUint64 minute = seconds % 60;
  seconds /= 60;
  const CMPIUint64 hour = seconds % 24;
  const CMPIUint64 days = seconds / 24;
  char buffer[40];
  if (interval) {
    std::snprintf(buffer, sizeof buffer, "%08llu%02llu%02llu%02llu.%06llu:000",
                  static_cast<unsigned long long>(days % 100000000ULL),
                  static_cast<unsigned long long>(hour), static_cast<unsigned long long>(minute),
                  static_cast<unsigned long long>(second),
                  static_cast<unsigned long long>(fraction));
  } else {
    long long year = 0;
    unsigned month = 0;
    unsigned day = 0;
    civilFromDays(static_cast<long long>(days), year, month, day);
    std::snprintf(buffer, sizeof buffer, "%04lld%02u%02u%02llu%02llu%02llu.%06llu+000",
                  year % 10000, month, day, static_cast<unsigned long long>(hour),
                  static_cast<unsigned long long>(minute), static_cast<unsigned long long>(second),
                  static_cast<unsigned long long>(fraction));
  }
  return buffer;
}

std::optional<DateTimeParts> parseCimDateTime(std::string_view text) {
  if (text.size() != 25 || text[14] != '.') return std::nullopt;
  const char sign = text[21];
  if (sign != '+' && sign != '-' && sign != ':') return std::nullopt;
  CMPIUint64 hour = 0, minute = 0, second = 0, fraction = 0, offset = 0;
  if (!readDigits(text, 8, 2, hour) || !readDigits(text, 10, 2, minute) ||
      !readDigits(text, 12, 2, second) || !readDigits(text, 15, 6, fraction) ||
      !readDigits(text, 22, 3, offset)) {
    return std::nullopt;
  }
  if (hour > 23 || minute > 59 || second > 60) return std::nullopt;
  const CMPIUint64 timeOfDay = (hour * 3600 + minute * 60 + second) * kMicrosPerSecond + fraction;

  DateTimeParts parts;
  if (sign == ':') {
    CMPIUint64 days = 0;
    if (!readDigits(text, 0, 8, days)) return std::nullopt;
    parts.interval = true;
    parts.micros = days * kSecondsPerDay * kMicrosPerSecond + timeOfDay;
    return parts;
  }
  CMPIUint64 year = 0, month = 0, day = 0;
  if (!readDigits(text, 0, 4, year) || !readDigits(text, 4, 2, month) ||
      !readDigits(text, 6, 2, day) || month < 1 || month > 12 || day < 1 || day > 31) {
    return std::nullopt;
  }
  const long long days = daysFromCivil(static_cast<long long>(year), static_cast<unsigned>(month),
                                       static_cast<unsigned>(day));
  // The text is local time at the given offset east of UTC; UTC is local time minus the offset.
  long long micros = days * static_cast<long long>(kSecondsPerDay * kMicrosPerSecond) +
                     static_cast<long long>(timeOfDay);
  const long long offsetMicros = static_cast<long long>(offset) * 60 * 1000000LL;
  micros += sign == '+' ? -offsetMicros : offsetMicros;
  if (micros < 0) return std::nullopt;
  parts.micros = static_cast<CMPIUint64>(micros);
  return parts;
}

CMPIUint64 nowMicros() {
  const auto now = std::chrono::system_clock::now().time_since_epoch();
  return static_cast<CMPIUint64>(
      std::chrono::duration_cast<std::chrono::microseconds>(now).count());
}

}  // namespace cmpihost::detail
