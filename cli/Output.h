// What the tool writes: the results on standard output, the status, notes and (with --verbose)
// the broker's trace messages on standard error.
#pragma once

#include <cmpihost/records.h>

#include <ostream>
#include <string>

#include "Report.h"

namespace bluelight::cli {

/// The results as text: MOF instance declarations separated by a blank line, each preceded by
/// its path as a "//" comment; or one object path per line. Empty when there is nothing.
std::string resultsText(const Report& report);

/// The results on `out`: the text above, or with `json` the JSON document (see JsonFormat.h).
void writeResults(const Report& report, bool json, std::ostream& out);

/// "status: CMPI_RC_OK" (or "status: <code name>: <message>"), then a "note: " line for every
/// note, and with `verbose` also for the verbose notes.
void writeStatus(const Report& report, bool verbose, std::ostream& err);

/// A trace message as --verbose shows it: "trace: [WARNING] BlueLightProfileProvider: text".
std::string traceLine(const cmpihost::TraceRecord& trace);
/// A log message as --verbose shows it: "log: [severity 2] id: text".
std::string logLine(const cmpihost::LogRecord& log);

}  // namespace bluelight::cli
