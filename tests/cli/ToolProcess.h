// Runs the built tool as a subprocess with a controlled environment and collects what it wrote.
#pragma once

#include <map>
#include <string>
#include <vector>

namespace clitest {

struct ProcessResult {
  int exitCode = -1;  ///< the exit status, or -1 when the process did not exit normally
  std::string out;
  std::string err;
};

/// Runs `program` with `arguments`. The environment is the test's own without any KESTA_*,
/// VNLOG_* or locale variable, plus `environment`.
ProcessResult runProcess(const std::string& program, const std::vector<std::string>& arguments,
                         const std::map<std::string, std::string>& environment);

}  // namespace clitest
