// The CIM text form of date/times: "yyyymmddhhmmss.mmmmmm+utc" for a point in time (utc being the
// offset from UTC in minutes, with its sign) and "ddddddddhhmmss.mmmmmm:000" for an interval.
#pragma once

#include <cmpidt.h>

#include <optional>
#include <string>
#include <string_view>

namespace cmpihost::detail {

struct DateTimeParts {
  CMPIUint64 micros = 0;  // since 1970-01-01 00:00:00 UTC, or the length of an interval
  bool interval = false;
};

/// The text of a point in time (always written in UTC, "+000") or of an interval.
std::string formatCimDateTime(CMPIUint64 micros, bool interval);

/// Reads the text; nullopt when it is not 25 characters of the form above, names an impossible
/// date or a point in time before 1970.
std::optional<DateTimeParts> parseCimDateTime(std::string_view text);

/// Microseconds since 1970-01-01 00:00:00 UTC, now.
CMPIUint64 nowMicros();

}  // namespace cmpihost::detail
