// A BMC on the loopback interface for the IPMI tests: OpenIPMI's simulator ipmi_sim, started on
// a free UDP port from a lan.conf and an emulator file generated into a temporary folder, with
// (or without) the identify plug-in of tests/ipmi-sim. The simulator is always stopped by its
// process id when the object goes - also when a test fails or throws - and it is asked to die
// with the test process should that be killed.
#ifndef BLUELIGHT_TESTS_PLATFORM_IPMISIMULATOR_H
#define BLUELIGHT_TESTS_PLATFORM_IPMISIMULATOR_H

#include <gtest/gtest.h>
#include <sys/types.h>

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "TestSupport.h"

namespace ipmi_test {

// The variable that lets a developer skip the simulator tests on a machine without OpenIPMI.
constexpr const char* kOptOutVariable = "BLUELIGHT_SKIP_IPMI_SIM_TESTS";

// What the simulator tests need that is missing here (ipmi_sim, the identify plug-in, the
// network transport), or nothing when they can run.
std::optional<std::string> simulatorUnavailable();

// Fails the current test (or skips it, when BLUELIGHT_SKIP_IPMI_SIM_TESTS is set to anything but
// "" or "0") when the simulator tests cannot run. For SetUp().
#define REQUIRE_IPMI_SIMULATOR()                                                                 \
  do {                                                                                           \
    if (const std::optional<std::string> missing = ::ipmi_test::simulatorUnavailable()) {        \
      if (::ipmi_test::optedOut()) {                                                             \
        GTEST_SKIP() << *missing << " (skipped: " << ::ipmi_test::kOptOutVariable << " is set)"; \
      }                                                                                          \
      FAIL() << *missing << ". Install the Debian packages openipmi and libopenipmi-dev and "    \
             << "configure again, or set " << ::ipmi_test::kOptOutVariable                       \
             << "=1 to skip the simulator tests.";                                               \
    }                                                                                            \
  } while (false)

bool optedOut();

struct SimulatorOptions {
  bool identifyPlugin = true;  // without it, the BMC does not report an identify state
  std::string pluginOptions;   // e.g. "reply=short" (see tests/ipmi-sim/identify_plugin.c)
};

class IpmiSimulator {
 public:
  // Starts the simulator and waits until it answers an RMCP ping; throws std::runtime_error
  // with the simulator's output when it does not come up.
  explicit IpmiSimulator(const SimulatorOptions& options = {});
  ~IpmiSimulator();
  IpmiSimulator(const IpmiSimulator&) = delete;
  IpmiSimulator& operator=(const IpmiSimulator&) = delete;

  // Stops the simulator (SIGTERM, then SIGKILL) and reaps it. Idempotent.
  void stop();

  unsigned int port() const { return port_; }
  pid_t pid() const { return pid_; }
  // The credentials file (mode 0600) of the account the provider reads with (user privilege).
  const std::string& readerCredentials() const { return readerCredentials_; }
  // The simulator's standard output and error so far.
  std::string output() const;

  // "ipmi-lan:127.0.0.1:<port>?credentials=<reader>", then "&" and `options` when given.
  std::string sourceText(const std::string& options = "") const;

  // Switches the simulated light with Chassis Identify, sent as the administrator account;
  // throws std::runtime_error unless the BMC accepts it.
  //   identify({})        on for 15 s       identify({0})     off
  //   identify({n})       on for n seconds  identify({0, 1})  on until switched off
  // The seconds are those of the simulated BMC's own clock, which stands still until
  // letTimePass moves it.
  void identify(const std::vector<std::uint8_t>& data) const;
  // Moves the simulated BMC's clock on (0 to 255 s); a timed identify whose seconds are up ends.
  void letTimePass(std::chrono::seconds seconds) const;

 private:
  bool startOnce(const SimulatorOptions& options, std::string& why);
  // Sends one request as the administrator account; throws unless it is answered with 00h.
  void command(std::uint8_t netFn, std::uint8_t command, const std::vector<std::uint8_t>& data,
               const std::string& what) const;

  testsupport::TempDir dir_;
  std::string readerCredentials_;
  std::string keeperCredentials_;
  std::string outputFile_;
  unsigned int port_ = 0;
  pid_t pid_ = -1;
};

// A loopback UDP port that nothing listens on at the moment.
unsigned int freeUdpPort();

// Writes `text` to `file` with mode 0600.
void writePrivateFile(const std::string& file, const std::string& text);

// The median of some durations, in microseconds.
double medianMicroseconds(std::vector<std::chrono::nanoseconds> samples);

}  // namespace ipmi_test

#endif  // BLUELIGHT_TESTS_PLATFORM_IPMISIMULATOR_H
