#include "Output.h"

#include <cmpidt.h>

#include "JsonFormat.h"
#include "MofFormat.h"
#include "PathText.h"

namespace bluelight::cli {

namespace {

std::string levelName(int level) {
  switch (level) {
    case CMPI_LEV_INFO:
      return "INFO";
    case CMPI_LEV_WARNING:
      return "WARNING";
    case CMPI_LEV_VERBOSE:
      return "VERBOSE";
    default:
      return "level " + std::to_string(level);
  }
}

}  // namespace

std::string resultsText(const Report& report) {
  std::string text;
  for (const cmpihost::InstanceValue& instance : report.instances) {
    if (!text.empty()) text += "\n";
    text += mofInstance(instance);
  }
  for (const cmpihost::ObjectPathValue& path : report.paths) text += formatPath(path) + "\n";
  return text;
}

void writeResults(const Report& report, bool json, std::ostream& out) {
  if (json) {
    out << jsonReport(report).dump(2) << "\n";
  } else {
    out << resultsText(report);
  }
  out.flush();
}

void writeStatus(const Report& report, bool verbose, std::ostream& err) {
  err << "status: " << report.status.toString() << "\n";
  for (const std::string& note : report.notes) err << "note: " << note << "\n";
  if (verbose) {
    for (const std::string& note : report.verboseNotes) err << "note: " << note << "\n";
  }
  err.flush();
}

std::string traceLine(const cmpihost::TraceRecord& trace) {
  return "trace: [" + levelName(trace.level) + "] " + trace.component.value_or("(null)") + ": " +
         trace.text.value_or("(null)");
}

std::string logLine(const cmpihost::LogRecord& log) {
  return "log: [severity " + std::to_string(log.severity) + "] " + log.id.value_or("(null)") +
         ": " + log.text.value_or("(null)");
}

}  // namespace bluelight::cli
