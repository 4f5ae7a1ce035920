#include "instrumentation/json/JsonFileSource.h"

#include "os/FileIo.h"

namespace Kesta {
namespace platform {

std::vector<InstrumentationNode> JsonFileSource::readNodes() const {
  const ReadResult read = readRegularFile(*files_, path_, kJsonSnapshotLimit);
  if (!read.ok()) {
    throw SourceError(read.reason);
  }
  return parseNodeSnapshot(read.data);
}

}  // namespace platform
}  // namespace Kesta
