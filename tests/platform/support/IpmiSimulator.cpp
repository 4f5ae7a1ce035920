#include "IpmiSimulator.h"

#include "ChildProcess.h"

#include <arpa/inet.h>
#include <fcntl.h>
#include <netinet/in.h>
#include <poll.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <stdexcept>
#include <thread>

#include "instrumentation/ipmi/IpmiCredentials.h"
#include "instrumentation/ipmi/IpmiLanTransport.h"

namespace ipmi_test {

namespace {

using namespace std::chrono_literals;
using Clock = std::chrono::steady_clock;

constexpr auto kStartTimeout = 5s;
constexpr int kStartAttempts = 3;

bool isExecutable(const std::string& path) {
  return !path.empty() && ::access(path.c_str(), X_OK) == 0;
}

bool exists(const std::string& path) {
  struct stat info = {};
  return !path.empty() && ::stat(path.c_str(), &info) == 0;
}

// ipmi_sim as configured, else from PATH (it may have been installed after configuring).
std::string simulatorExecutable() {
  if (isExecutable(IPMI_TEST_SIMULATOR)) {
    return IPMI_TEST_SIMULATOR;
  }
  const char* path = std::getenv("PATH");
  std::string directories = path != nullptr ? path : "/usr/bin:/usr/sbin";
  std::size_t start = 0;
  while (start <= directories.size()) {
    const std::size_t end = std::min(directories.find(':', start), directories.size());
    std::string candidate = directories.substr(start, end - start) + "/ipmi_sim";
    if (end > start && isExecutable(candidate)) {
      return candidate;
    }
    start = end + 1;
  }
  return std::string();
}

std::string replaceAll(std::string text, const std::string& from, const std::string& to) {
  for (std::size_t at = text.find(from); at != std::string::npos;
       at = text.find(from, at + to.size())) {
    text.replace(at, from.size(), to);
  }
  return text;
}

// An ASF presence ping (RMCP class 6); a BMC that serves RMCP answers it with a pong.
bool answersRmcpPing(unsigned int port, std::chrono::milliseconds wait) {
  const int fd = ::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
  if (fd < 0) {
    return false;
  }
  sockaddr_in address = {};
  address.sin_family = AF_INET;
  address.sin_port = htons(static_cast<std::uint16_t>(port));
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  const unsigned char ping[] = {0x06, 0x00, 0xff, 0x06, 0x00, 0x00,
                                0x11, 0xbe, 0x80, 0x01, 0x00, 0x00};
  bool pong = false;
  if (::connect(fd, reinterpret_cast<sockaddr*>(&address), sizeof address) == 0 &&
      ::send(fd, ping, sizeof ping, 0) == static_cast<ssize_t>(sizeof ping)) {
    pollfd ready = {fd, POLLIN, 0};
    if (::poll(&ready, 1, static_cast<int>(wait.count())) == 1) {
      unsigned char answer[64] = {};
      const ssize_t got = ::recv(fd, answer, sizeof answer, 0);
      pong = got >= 9 && answer[3] == 0x06 && answer[8] == 0x40;
    }
  }
  ::close(fd);
  return pong;
}

}  // namespace

std::optional<std::string> simulatorUnavailable() {
  if (simulatorExecutable().empty()) {
    return std::string("OpenIPMI's BMC simulator ipmi_sim is not installed");
  }
  if (std::string(IPMI_TEST_SIMULATOR_PLUGIN).empty()) {
    return std::string(
        "the identify plug-in of tests/ipmi-sim was not built: OpenIPMI's simulator headers "
        "(OpenIPMI/mcserv.h) were not found when the build was configured");
  }
  if (!exists(IPMI_TEST_SIMULATOR_PLUGIN)) {
    return "the identify plug-in " + std::string(IPMI_TEST_SIMULATOR_PLUGIN) + " is missing";
  }
  if (std::string(IPMI_TEST_LAN_PLUGIN).empty()) {
    return std::string(
        "the network transport bluelight-ipmi-lan.so was not built: OpenIPMI was not found when "
        "the build was configured (BLUELIGHT_IPMI_LAN)");
  }
  if (!exists(IPMI_TEST_LAN_PLUGIN)) {
    return "the network transport " + std::string(IPMI_TEST_LAN_PLUGIN) + " is missing";
  }
  return std::nullopt;
}

bool optedOut() {
  const char* value = std::getenv(kOptOutVariable);
  return value != nullptr && value[0] != '\0' && std::string(value) != "0";
}

unsigned int freeUdpPort() {
  const int fd = ::socket(AF_INET, SOCK_DGRAM | SOCK_CLOEXEC, 0);
  if (fd < 0) {
    throw std::runtime_error("no UDP socket");
  }
  sockaddr_in address = {};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  socklen_t length = sizeof address;
  if (::bind(fd, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0 ||
      ::getsockname(fd, reinterpret_cast<sockaddr*>(&address), &length) != 0) {
    ::close(fd);
    throw std::runtime_error("cannot find a free UDP port");
  }
  ::close(fd);
  return ntohs(address.sin_port);
}

void writePrivateFile(const std::string& file, const std::string& text) {
  testsupport::writeFile(file, text);
  if (::chmod(file.c_str(), 0600) != 0) {
    throw std::runtime_error("cannot chmod " + file);
  }
}

double medianMicroseconds(std::vector<std::chrono::nanoseconds> samples) {
  if (samples.empty()) {
    return 0.0;
  }
  std::sort(samples.begin(), samples.end());
  const std::size_t middle = samples.size() / 2;
  const double upper = static_cast<double>(samples[middle].count());
  const double lower =
      samples.size() % 2 == 0 ? static_cast<double>(samples[middle - 1].count()) : upper;
  return (lower + upper) / 2.0 / 1000.0;
}

IpmiSimulator::IpmiSimulator(const SimulatorOptions& options)
    : readerCredentials_(dir_.file("reader.conf")),
      keeperCredentials_(dir_.file("keeper.conf")),
      outputFile_(dir_.file("ipmi_sim.out")) {
  writePrivateFile(readerCredentials_, "user = reader\npassword = reader-pass\n");
  writePrivateFile(keeperCredentials_,
                   "user = keeper\npassword = keeper-pass\nprivilege = administrator\n");
  std::string why;
  for (int attempt = 0; attempt < kStartAttempts; ++attempt) {
    if (startOnce(options, why)) {
      return;
    }
  }
  throw std::runtime_error("ipmi_sim did not come up: " + why);
}

IpmiSimulator::~IpmiSimulator() { stop(); }

bool IpmiSimulator::startOnce(const SimulatorOptions& options, std::string& why) {
  const std::string executable = simulatorExecutable();
  const std::string config = IPMI_TEST_SIMULATOR_CONFIG;
  port_ = freeUdpPort();
  const std::string loadlib = options.identifyPlugin
                                  ? "loadlib \"" + std::string(IPMI_TEST_SIMULATOR_PLUGIN) +
                                        "\" \"" + options.pluginOptions + "\""
                                  : std::string("# no identify plug-in: identify is not reported");
  const std::string lanConf = dir_.file("lan.conf");
  testsupport::writeFile(
      lanConf, replaceAll(replaceAll(testsupport::readFile(config + "/lan.conf.in"), "@PORT@",
                                     std::to_string(port_)),
                          "@LOADLIB@", loadlib));
  const std::string state = dir_.file("state-" + std::to_string(port_));
  if (::mkdir(state.c_str(), 0700) != 0 && errno != EEXIST) {
    why = "cannot make " + state;
    return false;
  }
  const std::string emu = config + "/bmc.emu";

  // Should the test process die without stopping it (a crash, a CTest timeout), the simulator
  // goes too instead of holding its port.
  const pid_t child = platform_test::spawnChild(
      {executable, "-c", lanConf, "-f", emu, "-s", state, "-n"}, outputFile_);
  if (child < 0) {
    why = "fork failed";
    return false;
  }
  pid_ = child;

  const Clock::time_point giveUp = Clock::now() + kStartTimeout;
  while (Clock::now() < giveUp) {
    int status = 0;
    if (::waitpid(pid_, &status, WNOHANG) == pid_) {
      pid_ = -1;
      why = "ipmi_sim ended at once (port " + std::to_string(port_) + "): " + this->output();
      return false;
    }
    if (answersRmcpPing(port_, 50ms)) {
      return true;
    }
  }
  stop();
  why = "ipmi_sim did not answer an RMCP ping within 5 s: " + this->output();
  return false;
}

void IpmiSimulator::stop() {
  if (pid_ <= 0) {
    return;
  }
  // The simulator keeps nothing worth a clean exit; SIGKILL cannot be caught, so the wait ends.
  platform_test::killChild(pid_);
  pid_ = -1;
}

std::string IpmiSimulator::output() const { return testsupport::readFile(outputFile_); }

std::string IpmiSimulator::sourceText(const std::string& options) const {
  std::string text =
      "ipmi-lan:127.0.0.1:" + std::to_string(port_) + "?credentials=" + readerCredentials_;
  if (!options.empty()) {
    text += "&" + options;
  }
  return text;
}

void IpmiSimulator::identify(const std::vector<std::uint8_t>& data) const {
  command(0x00, 0x04, data, "Chassis Identify");
}

void IpmiSimulator::letTimePass(std::chrono::seconds seconds) const {
  if (seconds.count() < 0 || seconds.count() > 255) {
    throw std::invalid_argument("the simulated BMC moves its clock by 0 to 255 s at a time");
  }
  command(0x30, 0x01, {static_cast<std::uint8_t>(seconds.count())}, "Let Time Pass");
}

void IpmiSimulator::command(std::uint8_t netFn, std::uint8_t command,
                            const std::vector<std::uint8_t>& data, const std::string& what) const {
  using namespace Kesta::platform;
  IpmiLanTarget target;
  target.host = "127.0.0.1";
  target.port = port_;
  target.credentials = readIpmiCredentials(keeperCredentials_);
  const IpmiLanTransport transport(std::move(target));
  // Only a bound for a simulator that hangs; no test measures it.
  const IpmiResponse response =
      transport.transact({netFn, command, data}, IpmiClock::now() + std::chrono::seconds(3));
  if (!response.answered) {
    throw std::runtime_error(what + " was not answered: " + response.failure);
  }
  if (response.data.empty() || response.data[0] != 0x00) {
    throw std::runtime_error(what + " was refused");
  }
}

}  // namespace ipmi_test
