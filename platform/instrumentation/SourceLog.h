// The one kind of line the instrumentation writes: a source, or the configuration of the sources,
// that cannot be used. One category and one level for all of them, so that one log filter finds
// every such problem whatever source it came from.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_SOURCELOG_H
#define KESTA_PLATFORM_INSTRUMENTATION_SOURCELOG_H

#include <string>

namespace Kesta {
namespace platform {

// Never "Varnel.": those categories are the module's.
constexpr const char* kInstrumentationLogCategory = "Kesta.Platform.Instrumentation";
constexpr int kInstrumentationLogLevel = 6000;

// Writes `text` as one such line.
void logSourceProblem(const std::string& text);

// "Instrumentation source \"<text>\"", then " (from <origin>)" when there is an origin: how every
// line about one source names it. `text` is written printable.
std::string describeSource(const std::string& text, const std::string& origin);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_SOURCELOG_H
