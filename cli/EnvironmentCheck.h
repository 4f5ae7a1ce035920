// Checks of the environment the provider reads, so that a mistake there is pointed out instead
// of showing up only as an empty answer (the provider reports it to its own log alone).
#pragma once

#include <optional>
#include <string>

namespace bluelight::cli {

/// A remark on the value of KESTA_INSTRUMENTATION (null when unset): a file: source whose file
/// cannot be read, alone or as the first such entry of a list. nullopt when there is nothing to
/// say.
std::optional<std::string> instrumentationRemark(const char* setting);

}  // namespace bluelight::cli
