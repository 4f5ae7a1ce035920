// The "sysfs:<dir>" source: the blue and identification LEDs of the Linux LED class.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_LEDS_SYSFSLEDSOURCE_H
#define KESTA_PLATFORM_INSTRUMENTATION_LEDS_SYSFSLEDSOURCE_H

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/InstrumentationSource.h"
#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

constexpr const char* kDefaultSysfsLedDirectory = "/sys/class/leds";

// The description every LED node carries: the LED class knows no better name, and it is the
// text the module turns into the light's ElementName.
constexpr const char* kSysfsLedDescription = "Blue Light";

// The three parts of an LED name "devicename:colour:function". Names with fewer colons are read
// from the right: "blue:status" is colour and function, "uid" a function alone; with more
// colons the extra ones belong to the device name ("0000:03:00.0:blue:locate").
struct LedName {
  std::string device;
  std::string colour;
  std::string function;
};
LedName splitLedName(std::string_view name);

// True for the LEDs that are published as blue lights: colour "blue", or a function that names
// identification. The function is split into words at '-', '_' and blanks, and one of the words
// must be identify, identification, locate, locator or uid (so "identify-1", "chassis_locate"
// and "uid" count; "indicator" and "id" alone do not). Case is ignored.
bool isBlueLight(const LedName& name);
// The second half of that rule alone: a function that names identification, whatever the colour.
bool isIdentifyLed(const LedName& name);

// Which LEDs a source publishes: those of isBlueLight (the default), or only those of
// isIdentifyLed ("sysfs:<dir>?lights=identify"; what auto reads, because a blue LED that does
// not identify anything - a laptop's power light, say - is not an identify light).
enum class LedSelection { BlueOrIdentify, IdentifyOnly };

// The alarm state (node property 1) of an LED: 1 off, 2 steady, 3 alternating. `trigger` is the
// active trigger (the word in brackets in the trigger file; "none" when there is no trigger
// file); `brightness` is the brightness file's value when it could be read. The trigger decides
// first, because brightness flips on and off while a timer blinks:
//   default-on                              -> 2
//   timer, heartbeat, pattern, activity     -> 3 (they blink for as long as they are set)
//   none and every other trigger            -> brightness: 0 -> 1, above 0 -> 2
// Event triggers (disk-activity, netdev, phy..., oneshot, transient, ...) light the LED only
// now and then, so the brightness of the moment is the best answer for them. Nothing when the
// brightness is needed but unknown.
std::optional<unsigned int> ledAlarmState(std::string_view trigger,
                                          std::optional<unsigned long> brightness);

class SysfsLedSource final : public InstrumentationSource {
 public:
  // The class folder is read through `files`: the real file system, or a test's.
  explicit SysfsLedSource(std::string directory,
                          std::shared_ptr<FileSystem> files = systemFileSystem(),
                          LedSelection selection = LedSelection::BlueOrIdentify)
      : directory_(std::move(directory)), files_(std::move(files)), selection_(selection) {}

  std::string name() const override {
    return "sysfs:" + directory_ +
           (selection_ == LedSelection::IdentifyOnly ? "?lights=identify" : "");
  }
  // One node of type 26 per blue light, sorted by directory name; path text = directory name,
  // description = kSysfsLedDescription. A light whose state can be read has status 1 and the
  // alarm state property; one whose trigger or brightness cannot be read is still listed, with
  // status 0 and no property. Throws SourceError when the directory cannot be listed.
  std::vector<InstrumentationNode> readNodes() const override;

 private:
  std::string directory_;
  std::shared_ptr<FileSystem> files_;
  LedSelection selection_;
};

// The source for the text after "sysfs:": "[<directory>][?lights=identify|blue-or-identify]",
// the directory /sys/class/leds when none is named. Throws SourceError for other options.
std::unique_ptr<InstrumentationSource> makeSysfsLedSource(std::string_view rest,
                                                          std::shared_ptr<FileSystem> files);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_LEDS_SYSFSLEDSOURCE_H
