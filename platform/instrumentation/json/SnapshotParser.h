// The parser of the "file:<path>" source's snapshot text.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_JSON_SNAPSHOTPARSER_H
#define KESTA_PLATFORM_INSTRUMENTATION_JSON_SNAPSHOTPARSER_H

#include <cstddef>
#include <string_view>
#include <vector>

#include "instrumentation/InstrumentationSource.h"

namespace Kesta {
namespace platform {

// The largest snapshot that is read. A tree of a million nodes stays well below it.
constexpr std::size_t kJsonSnapshotLimit = std::size_t{256} * 1024 * 1024;

// The nodes of a snapshot text:
//   {"nodes": [{"type": 26, "path": "1.2", "description": "Blue Light", "status": 1,
//               "properties": {"1": 2}}, ...]}
// "type", "path" and "description" are required; "status" (default 0) and "properties" (default
// none) are optional; members with other names are ignored, at the top and in the nodes, so a
// snapshot may carry extra information. Numbers are whole numbers from 0 to 4294967295, property
// keys are such numbers written in decimal without sign, blanks or leading zeros. A member given
// twice, a text holding U+0000 (it could not pass through a C string) and anything else out of
// shape throws SourceError naming the place, e.g. "nodes[3].type is not a whole number from 0
// to 4294967295"; text that is not strict JSON (RFC 8259, UTF-8) throws SourceError naming the
// line and column, e.g. "it is not valid JSON: unexpected character '}' at line 1, column 12".
std::vector<InstrumentationNode> parseNodeSnapshot(std::string_view json);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_JSON_SNAPSHOTPARSER_H
