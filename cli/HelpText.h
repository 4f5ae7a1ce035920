// The texts of --help and --version.
#pragma once

#include <string>

namespace bluelight::cli {

std::string helpText();
std::string versionText();

}  // namespace bluelight::cli
