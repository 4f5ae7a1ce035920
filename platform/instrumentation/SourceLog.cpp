#include "instrumentation/SourceLog.h"

#include "VNLog.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

void logSourceProblem(const std::string& text) {
  VNLog::VNLogger::logLevelMessage(__func__, __FILE__, __LINE__, kInstrumentationLogCategory,
                                   kInstrumentationLogLevel, nullptr, 0, 0, text);
}

std::string describeSource(const std::string& text, const std::string& origin) {
  std::string description = "Instrumentation source \"" + printable(text) + "\"";
  if (!origin.empty()) {
    description += " (from " + printable(origin) + ")";
  }
  return description;
}

}  // namespace platform
}  // namespace Kesta
