// The whole tool behind main(): arguments in, exit code out.
#pragma once

#include <ostream>
#include <string>
#include <vector>

namespace bluelight::cli {

enum ExitCode : int {
  kExitOk = 0,        ///< the status is CMPI_RC_OK (also --help, --version)
  kExitFailed = 1,    ///< the status is an error, or no provider serves the class
  kExitUsage = 2,     ///< the command line cannot be used; nothing was loaded
  kExitNotLoaded = 3  ///< the provider library or an MI cannot be loaded
};

struct ToolIo {
  /// The tool's own executable, where the default library is looked for.
  std::string executablePath;
  std::ostream& out;
  std::ostream& err;
};

/// Runs the tool on `arguments` (without the program name).
int runTool(const std::vector<std::string>& arguments, const ToolIo& io);

}  // namespace bluelight::cli
