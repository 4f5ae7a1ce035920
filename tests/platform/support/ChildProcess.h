// The programs the platform tests run beside themselves (the BMC simulator, the mock Redfish
// service, the tools that make their certificates), started and ended one way.
#ifndef BLUELIGHT_TESTS_PLATFORM_SUPPORT_CHILDPROCESS_H
#define BLUELIGHT_TESTS_PLATFORM_SUPPORT_CHILDPROCESS_H

#include <sys/types.h>

#include <string>
#include <vector>

namespace platform_test {

// Starts `arguments` (the program's path first) with standard output and error appended to
// `output` and standard input from /dev/null. The child dies with the test process (a crash, a
// test runner's timeout), so nothing outlives its test. When `handOver` is not -1, the child gets
// that descriptor as `handOverAs` (kept across exec). Everything is prepared before fork: the child
// makes only async-signal-safe calls. The child's pid, or -1 when fork fails.
pid_t spawnChild(std::vector<std::string> arguments, const std::string& output, int handOver = -1,
                 int handOverAs = -1);

// Waits for `child` to end; its exit status, or -1 when it did not exit normally.
int waitForChild(pid_t child);

// Ends `child` with SIGKILL, which it cannot catch, and reaps it.
void killChild(pid_t child);

// Runs a program to its end (as spawnChild starts it); its exit status, or -1.
int runChild(std::vector<std::string> arguments, const std::string& output);

}  // namespace platform_test

#endif  // BLUELIGHT_TESTS_PLATFORM_SUPPORT_CHILDPROCESS_H
