// The one exception of the instrumentation sources.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_SOURCEERROR_H
#define KESTA_PLATFORM_INSTRUMENTATION_SOURCEERROR_H

#include <stdexcept>

namespace Kesta {
namespace platform {

// Why a source or its configuration cannot be used. The text is the reason alone; the cursor
// adds which source it was.
class SourceError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_SOURCEERROR_H
