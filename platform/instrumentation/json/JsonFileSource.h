// The "file:<path>" source: a JSON snapshot of the instrumentation tree.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_JSON_JSONFILESOURCE_H
#define KESTA_PLATFORM_INSTRUMENTATION_JSON_JSONFILESOURCE_H

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/json/SnapshotParser.h"
#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

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
