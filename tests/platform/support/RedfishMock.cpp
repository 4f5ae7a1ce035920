#include "RedfishMock.h"

#include "ChildProcess.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <mutex>
#include <sstream>
#include <stdexcept>
#include <utility>

namespace redfish_test {

namespace {

// The descriptor the mock writes its port to once it listens ("--ready-fd").
constexpr int kReadyFd = 3;
// The certificates are made afresh every week and are valid for 30 days, so a build tree never
// holds expired ones.
constexpr long kDaysPerPki = 7;

bool exists(const std::string& path) {
  struct stat info = {};
  return !path.empty() && ::stat(path.c_str(), &info) == 0;
}

Pki makePki() {
  const long days = static_cast<long>(std::time(nullptr) / 86400);
  const std::string root = REDFISH_TEST_PKI_ROOT;
  std::filesystem::create_directories(root);
  Pki pki;
  pki.directory = root + "/week-" + std::to_string(days / kDaysPerPki);
  pki.authority = pki.directory + "/ca.pem";
  pki.otherAuthority = pki.directory + "/other-ca.pem";
  pki.key = pki.directory + "/server.key";
  pki.server = pki.directory + "/server.pem";
  pki.otherServer = pki.directory + "/other-server.pem";
  pki.wrongName = pki.directory + "/wrong-name.pem";
  if (exists(pki.wrongName)) {
    return pki;
  }
  // Made in a folder of its own and renamed into place, so that test processes running at once
  // never see half of it; the first rename wins and the others use its certificates.
  std::string scratch = root + "/making-XXXXXX";
  if (::mkdtemp(scratch.data()) == nullptr) {
    throw std::runtime_error("cannot make a folder in " + root);
  }
  const std::string log = scratch + ".log";
  const int status =
      platform_test::runChild({REDFISH_TEST_PYTHON, REDFISH_TEST_MOCK, "pki", scratch}, log);
  if (status != 0) {
    const std::string why = testsupport::readFile(log);
    std::filesystem::remove_all(scratch);
    std::filesystem::remove(log);
    throw std::runtime_error("the test certificates cannot be made: " + why);
  }
  std::filesystem::remove(log);
  if (::rename(scratch.c_str(), pki.directory.c_str()) != 0) {
    std::filesystem::remove_all(scratch);
  }
  if (!exists(pki.wrongName)) {
    throw std::runtime_error("the test certificates are missing from " + pki.directory);
  }
  return pki;
}

}  // namespace

const Pki& pki() {
  static std::mutex mutex;
  static std::optional<Pki> made;
  std::lock_guard<std::mutex> lock(mutex);
  if (!made) {
    made = makePki();
  }
  return *made;
}

std::string serviceFile(const std::string& service) {
  return std::string(REDFISH_TEST_SERVICES) + "/" + service + ".json";
}

void writePrivateFile(const std::string& file, const std::string& text) {
  testsupport::writeFile(file, text);
  if (::chmod(file.c_str(), 0600) != 0) {
    throw std::runtime_error("cannot chmod " + file);
  }
}

RedfishMock::RedfishMock(const MockOptions& options)
    : credentials_(dir_.file("reader.conf")),
      wrongCredentials_(dir_.file("wrong.conf")),
      eventsFile_(dir_.file("events.log")),
      outputFile_(dir_.file("mock.out")) {
  writePrivateFile(credentials_, "user = reader\npassword = reader-pass\n");
  writePrivateFile(wrongCredentials_, "user = reader\npassword = not-the-password\n");
  const Pki& certificates = pki();
  std::vector<std::string> arguments = {
      REDFISH_TEST_PYTHON,
      REDFISH_TEST_MOCK,
      "serve",
      "--service",
      serviceFile(options.service),
      "--cert",
      options.certificate.empty() ? certificates.server : options.certificate,
      "--key",
      certificates.key,
      "--ready-fd",
      std::to_string(kReadyFd),
      "--events",
      eventsFile_};
  for (const std::string& behaviour : options.behaviours) {
    arguments.emplace_back("--behave");
    arguments.push_back(behaviour);
  }
  // The mock writes its port to the pipe once it listens; reading blocks until then, and ends
  // without a port when the mock ended first (its end of the pipe closes with it). No clock and
  // no polling: a mock that never comes up is the test runner's timeout to catch.
  int ready[2] = {-1, -1};
  if (::pipe2(ready, O_CLOEXEC) != 0) {
    throw std::runtime_error("pipe failed");
  }
  const pid_t child =
      platform_test::spawnChild(std::move(arguments), outputFile_, ready[1], kReadyFd);
  if (child < 0) {
    ::close(ready[0]);
    ::close(ready[1]);
    throw std::runtime_error("fork failed");
  }
  pid_ = child;
  ::close(ready[1]);
  std::string port;
  char byte = 0;
  while (port.find('\n') == std::string::npos) {
    const ssize_t got = ::read(ready[0], &byte, 1);
    if (got < 0 && errno == EINTR) {
      continue;
    }
    if (got <= 0) {
      break;
    }
    port += byte;
  }
  ::close(ready[0]);
  if (port.empty() || port.back() != '\n') {
    stop();
    throw std::runtime_error("the mock Redfish service ended before it listened: " +
                             this->output());
  }
  port_ = static_cast<unsigned int>(std::stoul(port));
}

RedfishMock::~RedfishMock() { stop(); }

void RedfishMock::stop() {
  if (pid_ <= 0) {
    return;
  }
  // The mock keeps nothing worth a clean exit (its events are written line by line), and SIGKILL
  // cannot be caught, so the wait below ends.
  platform_test::killChild(pid_);
  pid_ = -1;
}

std::string RedfishMock::sourceText(const std::string& options) const {
  return sourceTextWithoutCa("ca=" + pki().authority + (options.empty() ? "" : "&" + options));
}

std::string RedfishMock::sourceTextWithoutCa(const std::string& options) const {
  std::string text =
      "redfish:https://127.0.0.1:" + std::to_string(port_) + "?credentials=" + credentials_;
  if (!options.empty()) {
    text += "&" + options;
  }
  return text;
}

std::vector<std::string> RedfishMock::events() const {
  std::vector<std::string> lines;
  std::istringstream in(testsupport::readFile(eventsFile_));
  for (std::string line; std::getline(in, line);) {
    lines.push_back(line);
  }
  return lines;
}

std::size_t RedfishMock::connections() const {
  std::size_t count = 0;
  for (const std::string& event : events()) {
    count += event == "connect" ? 1 : 0;
  }
  return count;
}

std::vector<std::string> RedfishMock::requests() const {
  std::vector<std::string> requests;
  for (const std::string& event : events()) {
    if (event != "connect" && event.rfind("handshake-failed", 0) != 0) {
      requests.push_back(event);
    }
  }
  return requests;
}

std::string RedfishMock::output() const { return testsupport::readFile(outputFile_); }

}  // namespace redfish_test
