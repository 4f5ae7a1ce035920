// Finding and loading the separately built plug-ins of the sources (the IPMI network transport on
// OpenIPMI, the Redfish transport on libcurl). They are separate so that the provider library
// never links those libraries: a plug-in is opened with dlopen only when a source that needs it
// is read, and a server that never reads such a source needs neither the plug-in nor its library.
//
// Each plug-in exports one entry point that returns a table of plain C function pointers whose
// first member is the table's ABI version (an unsigned int); the platform refuses a table of
// another version rather than guess. A loaded plug-in is kept for the life of the process:
// unloading code that a library's threads or atexit handlers may still run would crash the
// object manager.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_PLUGINLOADER_H
#define KESTA_PLATFORM_INSTRUMENTATION_PLUGINLOADER_H

#include <string>
#include <vector>

namespace Kesta {
namespace platform {

// What the loader needs to know of one plug-in, and the words its messages use.
struct PluginDescription {
  const char* file = "";        // "bluelight-ipmi-lan.so"
  const char* folder = "";      // the folder it sits in next to the provider library
  const char* installDir = "";  // that folder in an installation (under the libdir), looked in last
  bool built = false;           // whether this build made the plug-in at all
  const char* entryPoint = "";  // the symbol that returns the table
  unsigned int abiVersion = 0;  // the version of the table this platform was built against
  const char* what = "";        // "the network transport", as the messages name it
  const char* runtimeHint = "";  // what loading needs, e.g. "it needs OpenIPMI's libraries: ..."
  const char* notBuilt = "";     // the reason given when this build has no such plug-in
  // True when every entry point the platform calls is in the table (which has the right version).
  bool (*complete)(const void* table) = nullptr;
};

// Where the plug-in is looked for, in order, for a binary (the provider library, or the program
// the platform is linked into) in `binaryDirectory`:
//   <binaryDirectory>/<folder>/<file>
//   <binaryDirectory>/../lib/<folder>/<file>       (build-tree programs in build/bin)
//   <installDir>/<file>
std::vector<std::string> pluginCandidates(const std::string& binaryDirectory,
                                          const PluginDescription& plugin);

// Loads the first candidate that exists (for the directory of this binary) and returns its table.
// The first file found decides: loading a second, older copy instead would hide the problem.
// Throws SourceError, saying where it looked, when the plug-in is missing, cannot be loaded, is
// not the plug-in or is of another version. Not cached: callers keep the table they got.
const void* loadPlugin(const PluginDescription& plugin);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_PLUGINLOADER_H
