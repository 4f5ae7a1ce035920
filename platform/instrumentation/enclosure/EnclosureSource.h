// The "enclosure:[<directory>][?<options>]" source: the locate lights of the bays of SCSI
// enclosures (disk shelves, backplanes), as the kernel's enclosure class shows them in
// <directory> (default /sys/class/enclosure).
//
// The class directory holds one entry per enclosure, named after its SCSI device ("0:0:8:0", a
// symbolic link into the device tree; the name may change across reboots). An enclosure's
// directory holds `id` (its logical identifier, e.g. "0x500605b0000272bf"), `components`, the
// device's own entries (`device`, `power`, `subsystem`, `uevent`) and one directory per
// component, named after the component's descriptor text ("SLOT 01", "Disk 001") or after its
// number ("0", "1", ...). A component directory holds `locate`, `slot` (on newer kernels),
// `fault`, `status`, `type`, ... and, when a disk is in the bay, a `device` link to it.
//
// Every component with a `locate` attribute is one light; the others (fans, power supplies,
// enclosures that hide the attribute) are left out without a word. The names:
//
//   slot label   the component's name when it is not a plain number ("SLOT 01"); else
//                "Slot <n>", n the `slot` attribute when it holds a number, else the
//                component's number
//   slot key     the `slot` attribute when it holds a number, else the component's name
//   identity     the enclosure's `id`, trimmed, when it can be read and is not blank; else the
//                enclosure's directory name
//   description  "<slot label> locate light, enclosure <identity>" (the light's ElementName):
//                  "SLOT 01 locate light, enclosure 0x500605b0000272bf"
//                  "Slot 7 locate light, enclosure 0x500605b0000272bf"
//                  "Slot 3 locate light, enclosure 0:0:8:0"     (an enclosure without an id)
//   path         "enclosure/<identity>/<slot key>", e.g. "enclosure/0x500605b0000272bf/1"
//
// The path is made of what names the hardware (the enclosure's id and the slot), not of the
// order or the device names the kernel happened to give at boot, so a light keeps its DeviceID
// ("<description>:<path>") across reboots for as long as the hardware stays the same.
//
// <options>: on=alternating|steady, how a light that is on is reported (default alternating,
// since locate lights blink).
#ifndef KESTA_PLATFORM_INSTRUMENTATION_ENCLOSURE_ENCLOSURESOURCE_H
#define KESTA_PLATFORM_INSTRUMENTATION_ENCLOSURE_ENCLOSURESOURCE_H

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/IdentifyLight.h"
#include "instrumentation/InstrumentationSource.h"
#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

constexpr const char* kDefaultEnclosureDirectory = "/sys/class/enclosure";

// "enclosure:" parsed.
struct EnclosureSourceSettings {
  std::string directory = kDefaultEnclosureDirectory;
  OnReport onReport = OnReport::Alternating;
};

// Parses the text after "enclosure:". Throws SourceError with the reason (an unknown option, an
// on= value that is neither alternating nor steady, a malformed option list).
EnclosureSourceSettings parseEnclosureSource(std::string_view rest);

// The state a `locate` attribute holds: "0" off, "1" on (until switched off), with blanks and
// line ends around the value ignored; anything else is unusable, and the problem quotes it.
IdentifyReading enclosureLocateReading(std::string_view text);

class EnclosureSource final : public InstrumentationSource {
 public:
  // The class directory is read through `files`: the real file system, or a test's.
  explicit EnclosureSource(std::string directory,
                           std::shared_ptr<FileSystem> files = systemFileSystem(),
                           OnReport onReport = OnReport::Alternating)
      : directory_(std::move(directory)), files_(std::move(files)), onReport_(onReport) {}

  // "enclosure:<directory>", with "?on=steady" when that was asked for.
  std::string name() const override;

  // One node of type 26 per light (see identifyNode): enclosures in the order of their directory
  // names; in an enclosure the lights whose slot key is a number first, by its value, then the
  // others by name. Each walk reads `id` once per enclosure and `slot` and `locate` once per
  // light, nothing else (reading `locate` sends a command to the enclosure). A `locate` that
  // cannot be read or holds something other than 0 or 1 gives that light status 21 and one log
  // line at level 6000; an enclosure directory that cannot be opened or listed loses its lights
  // with one log line; a name with control characters or that is not UTF-8 is skipped with one.
  // Throws SourceError when the class directory cannot be opened or listed.
  std::vector<InstrumentationNode> readNodes() const override;

 private:
  void readEnclosure(int classFd, const std::string& directoryName,
                     std::vector<InstrumentationNode>& nodes) const;

  std::string directory_;
  std::shared_ptr<FileSystem> files_;
  OnReport onReport_;
};

// The source for the text after "enclosure:". Throws SourceError as parseEnclosureSource does.
std::unique_ptr<EnclosureSource> makeEnclosureSource(
    std::string_view rest, std::shared_ptr<FileSystem> files = systemFileSystem());

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_ENCLOSURE_ENCLOSURESOURCE_H
