// The "file:<path>" source: a JSON snapshot of the instrumentation tree.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_JSON_JSONFILESOURCE_H
#define KESTA_PLATFORM_INSTRUMENTATION_JSON_JSONFILESOURCE_H

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/InstrumentationSource.h"
#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

// The largest snapshot that is read. A tree of a million nodes stays well below it.
constexpr std::size_t kJsonSnapshotLimit = 256 * 1024 * 1024;

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

class JsonFileSource final : public InstrumentationSource {
 public:
  // The snapshot is read through `files`: the real file system, or a test's.
  explicit JsonFileSource(std::string path, std::shared_ptr<FileSystem> files = systemFileSystem())
      : path_(std::move(path)), files_(std::move(files)) {}

  std::string name() const override { return "file:" + path_; }
  // The file is read afresh on every call, so a new snapshot is seen by the next operation.
  std::vector<InstrumentationNode> readNodes() const override;

 private:
  std::string path_;
  std::shared_ptr<FileSystem> files_;
};

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_JSON_JSONFILESOURCE_H
