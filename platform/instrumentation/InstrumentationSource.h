// The narrow seam between the instrumentation cursor and wherever the nodes come from. A source
// has a name and yields the nodes in their order; new kinds of source (a management controller
// over IPMI or Redfish, say) plug in here and in makeInstrumentationSource, and neither the
// cursor nor the module changes.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_INSTRUMENTATIONSOURCE_H
#define KESTA_PLATFORM_INSTRUMENTATION_INSTRUMENTATIONSOURCE_H

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/SourceError.h"
#include "os/Clock.h"
#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

class IpmiDeviceOs;
std::shared_ptr<IpmiDeviceOs> systemIpmiDeviceOs();

// One numeric property of a node.
struct NodeProperty {
  unsigned int number = 0;
  unsigned int value = 0;

  friend bool operator==(const NodeProperty& a, const NodeProperty& b) {
    return a.number == b.number && a.value == b.value;
  }
};

// One node of the instrumentation tree, as every source delivers it.
struct InstrumentationNode {
  unsigned int type = 0;
  std::string path;         // the printable path text, e.g. "1.2" or "platform:blue:identify"
  std::string description;  // e.g. "Blue Light"
  unsigned int status = 0;  // 0: no status
  std::vector<NodeProperty> properties;  // each number at most once

  // The value of property `number`, if the node has it.
  std::optional<unsigned int> property(unsigned int number) const;

  friend bool operator==(const InstrumentationNode& a, const InstrumentationNode& b) {
    return a.type == b.type && a.path == b.path && a.description == b.description &&
           a.status == b.status && a.properties == b.properties;
  }
};

class InstrumentationSource {
 public:
  InstrumentationSource() = default;
  virtual ~InstrumentationSource();
  InstrumentationSource(const InstrumentationSource&) = delete;
  InstrumentationSource& operator=(const InstrumentationSource&) = delete;

  // The source as the user wrote it, e.g. "file:/var/lib/kesta/tree.json".
  virtual std::string name() const = 0;
  // Reads every node afresh. Throws SourceError when the source cannot be read or parsed.
  virtual std::vector<InstrumentationNode> readNodes() const = 0;
};

// What the sources use of the operating system: the file system, the clock their deadlines are
// measured by, and the IPMI device's system calls. The real ones unless a test hands in its own.
struct SourceSystem {
  std::shared_ptr<FileSystem> files = systemFileSystem();
  std::shared_ptr<const Clock> clock = steadyClock();
  std::shared_ptr<IpmiDeviceOs> ipmiDevice = systemIpmiDeviceOs();
};

// The one source that a source text names: "file:<path>", "sysfs:[<dir>]", "ipmi:[<device>]" or
// "ipmi-lan:<host>?credentials=<file>" (lists and "auto" are SourceList.h's). Throws SourceError
// for any other text.
std::unique_ptr<InstrumentationSource> makeInstrumentationSource(std::string_view text,
                                                                 const SourceSystem& system);
std::unique_ptr<InstrumentationSource> makeInstrumentationSource(std::string_view text);

// The configured source text and where it came from (for the log line when it fails).
struct SourceSetting {
  std::string text;
  std::string origin;  // "KESTA_INSTRUMENTATION", the configuration file's path, or "default"
};

// With nothing configured the platform finds the lights itself (SourceList.h).
constexpr const char* kDefaultSourceText = "auto";
constexpr const char* kDefaultConfigurationFile = "/etc/kesta/instrumentation.conf";

// KESTA_INSTRUMENTATION when set and not blank, else the first line of the configuration file
// when that exists, else kDefaultSourceText. Throws SourceError when the configuration file
// exists but cannot be read or its first line is blank. The file is read through `files`.
SourceSetting configuredSource(FileSystem& files);
// The same through the real file system.
SourceSetting configuredSource();

// Points configuredSource() at another configuration file; an empty path restores the default.
// For tests only: users configure through KESTA_INSTRUMENTATION or the file itself.
void setConfigurationFileForTesting(const std::string& path);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_INSTRUMENTATIONSOURCE_H
