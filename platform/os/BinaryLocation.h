// Where the binary that holds this code lives: the provider library, or the executable the
// platform is linked into (tests, tools). The locale looks for its catalogues and the IPMI source
// for its network plug-in relative to it, so that an installation moved to another prefix works.
#ifndef KESTA_PLATFORM_OS_BINARYLOCATION_H
#define KESTA_PLATFORM_OS_BINARYLOCATION_H

#include <string>

namespace Kesta {
namespace platform {

// The directory of the binary that holds this code. Empty when it cannot be found. Found once per
// process: the answer cannot change while the binary is loaded.
std::string ownBinaryDirectory();

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_OS_BINARYLOCATION_H
