// The explanation of a refused snapshot text, for parseNodeSnapshot.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_JSON_SNAPSHOTDIAGNOSIS_H
#define KESTA_PLATFORM_INSTRUMENTATION_JSON_SNAPSHOTDIAGNOSIS_H

#include <string>
#include <string_view>

namespace Kesta {
namespace platform {

// The first thing in `json` that breaks the snapshot rules of parseNodeSnapshot, in the words
// of its SourceError (e.g. "nodes[3].type is not a whole number from 0 to 4294967295" or "it is
// not valid JSON: unexpected character '}' at line 1, column 12"); empty when there is none.
std::string snapshotProblem(std::string_view json);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_JSON_SNAPSHOTDIAGNOSIS_H
