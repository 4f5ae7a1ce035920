// Several sources in one walk, and "auto", which finds them.
//
// A server's identify lights come from more than one place: the chassis light from its BMC, the
// drive bays' locate lights from its enclosures, a few LEDs from the LED class. So the configured
// text may name a list of sources separated by ';' (blanks around an entry are ignored), read in
// order in one walk, and "auto" - the default - names the sources this machine has:
//   - the in-band BMC ("ipmi:<device>") when an IPMI device exists (/dev/ipmi0, /dev/ipmi/0 or
//     /dev/ipmidev/0, the first one found);
//   - the enclosures' slots ("enclosure:/sys/class/enclosure") when that folder exists;
//   - the identify and locate LEDs of the LED class ("sysfs:/sys/class/leds?lights=identify")
//     when that folder exists.
// What is absent is skipped without a word (auto on a laptop gives no light and no error); what
// is present but cannot be read writes its line, as a listed source that fails does: one line at
// level 6000, and no lights from it, while the others still give theirs. A single source that is
// not "auto" keeps its own rule: when it fails, the walk fails (Instrumentation.cpp).
//
// The lights of one walk keep their DeviceIDs ("<description>:<path>") apart: a light whose ID
// was already given in the walk gets " #2" (" #3", ...) after its path. The suffix depends only on
// the order of the list and of each source's lights, which both follow the hardware, never on
// timing, so an ID stays the same from one walk to the next.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_SOURCELIST_H
#define KESTA_PLATFORM_INSTRUMENTATION_SOURCELIST_H

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/InstrumentationSource.h"

namespace Kesta {
namespace platform {

constexpr const char* kAutoSourceText = "auto";

// The longest list that is read; the entries after it are left out with a line in the log. Real
// servers name a handful of sources; the bound keeps a runaway configuration from costing a
// thousand reads on every operation.
constexpr std::size_t kMostListedSources = 64;

// True when `text` is read by readSourceList: "auto", or a text with a ';'.
bool isSourceList(std::string_view text);

// The entries of a list as read: blanks around each removed, empty ones and repeats dropped,
// at most kMostListedSources. `notes` says what was dropped, one sentence each.
struct ParsedSourceList {
  std::vector<std::string> entries;
  std::vector<std::string> notes;
};
ParsedSourceList parseSourceList(std::string_view text);

// Where "auto" looks. KESTA_DISCOVERY_ROOT, when set and not blank, is put in front of every
// path, so that tests (and someone looking at a copy of another machine's /dev and /sys) can
// point auto at a tree of their own.
struct DiscoveryRoots {
  std::vector<std::string> ipmiDevices = {"/dev/ipmi0", "/dev/ipmi/0", "/dev/ipmidev/0"};
  std::string enclosures = "/sys/class/enclosure";
  std::string leds = "/sys/class/leds";
};
DiscoveryRoots discoveryRoots();

// One source that a walk considered, and what came of it.
struct SourceOutcome {
  enum class State {
    Absent,      // auto found nothing of this kind on this machine
    Unreadable,  // the source could not be made or read; its line was logged
    Repeated,    // another entry named the same source, which was read once
    Read         // read; `lights` says how many blue lights it gave
  };
  std::string text;      // the source text, as listed or as auto made it
  std::string listedAs;  // the list entry it came from: itself, or "auto"
  State state = State::Absent;
  std::size_t lights = 0;
  std::string why;  // when it gave no light: why (what is absent, the failure, "no light")
};

// "absent", "unreadable", "repeated" or "read".
const char* toString(SourceOutcome::State state);

// Everything one walk of a list gave.
struct SourceListReading {
  std::vector<InstrumentationNode> nodes;  // every source's nodes, in order, IDs kept apart
  std::vector<SourceOutcome> outcomes;     // one per source considered, in order
  std::vector<std::string> notes;          // what the list itself did not allow
};

// Reads every source of a list (or auto, or a single source) in order. Failures are not thrown:
// each one writes its line (with `origin`, as the single-source line does) and gives no lights;
// so do the notes.
SourceListReading readSourceList(const SourceSetting& setting, const SourceSystem& system,
                                 const DiscoveryRoots& roots);

// Gives the lights of a walk distinct IDs (see above). Only blue-light nodes take part.
void keepDeviceIdsApart(std::vector<InstrumentationNode>& nodes);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_SOURCELIST_H
