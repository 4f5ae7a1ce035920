// One walk of a Redfish service through the real transport plug-in, as an operation of the
// provider makes it: the source reads its credentials file, opens one TLS connection and walks
// the service root, the Chassis collection, every chassis, storage resource and drive. The
// service is the mock of tests/redfish-mock (python3 and its ssl module) with the blade
// enclosure of services/ - four chassis, three storage resources and six drives, 15 GETs a walk
// - on a random loopback port, with certificates the program makes with openssl in a folder of
// its own that it removes at the end.
//
//   bluelight-redfish-bench [google-benchmark options]
//
// Besides the time per walk, the counters say how many TLS handshakes and requests one walk
// cost, as the mock counted them.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/redfish/RedfishSource.h"

namespace {

namespace fs = std::filesystem;
using namespace std::chrono_literals;

std::string readText(const std::string& file) {
  std::ifstream in(file);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

// Starts `arguments` with its output going to `output`; the child dies with this process.
pid_t start(std::vector<std::string> arguments, const std::string& output) {
  std::vector<char*> argv;
  argv.reserve(arguments.size() + 1);
  for (std::string& argument : arguments) {
    argv.push_back(argument.data());
  }
  argv.push_back(nullptr);
  const pid_t child = ::fork();
  if (child < 0) {
    throw std::runtime_error("fork failed");
  }
  if (child == 0) {
    ::prctl(PR_SET_PDEATHSIG, SIGKILL);
    const int out = ::open(output.c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
    if (out >= 0) {
      ::dup2(out, STDOUT_FILENO);
      ::dup2(out, STDERR_FILENO);
    }
    ::execv(argv[0], argv.data());
    ::_exit(127);
  }
  return child;
}

int wait(pid_t child) {
  int status = 0;
  while (::waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) {
      return -1;
    }
  }
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

// The mock service and its files, for the life of the object.
class MockService {
 public:
  MockService() {
    std::string folder = (fs::temp_directory_path() / "bluelight-redfish-bench-XXXXXX").string();
    if (::mkdtemp(folder.data()) == nullptr) {
      throw std::runtime_error("cannot make a temporary folder");
    }
    dir_ = folder;
    const std::string log = dir_ + "/mock.log";
    const std::string pki = dir_ + "/pki";
    if (wait(start({REDFISH_BENCH_PYTHON, REDFISH_BENCH_MOCK, "pki", pki}, log)) != 0) {
      throw std::runtime_error("the certificates cannot be made: " + readText(log));
    }
    credentials_ = dir_ + "/credentials.conf";
    {
      std::ofstream out(credentials_);
      out << "user = reader\npassword = reader-pass\n";
    }
    ::chmod(credentials_.c_str(), 0600);
    events_ = dir_ + "/events.log";
    const std::string portFile = dir_ + "/port";
    pid_ = start({REDFISH_BENCH_PYTHON, REDFISH_BENCH_MOCK, "serve", "--service",
                  std::string(REDFISH_BENCH_SERVICES) + "/blade-enclosure.json", "--cert",
                  pki + "/server.pem", "--key", pki + "/server.key", "--port-file", portFile,
                  "--events", events_, "--lifetime", "3600"},
                 log);
    for (int tries = 0; tries < 1000 && port_.empty(); ++tries) {
      std::this_thread::sleep_for(10ms);
      std::string text = readText(portFile);
      if (!text.empty() && text.back() == '\n') {
        text.pop_back();
        port_ = text;
      }
    }
    if (port_.empty()) {
      throw std::runtime_error("the mock Redfish service did not start: " + readText(log));
    }
    text_ = "redfish:https://127.0.0.1:" + port_ + "?credentials=" + credentials_ + "&ca=" + pki +
            "/ca.pem&timeout=10";
  }

  ~MockService() {
    if (pid_ > 0) {
      ::kill(pid_, SIGTERM);
      wait(pid_);
    }
    std::error_code ignored;
    fs::remove_all(dir_, ignored);
  }

  MockService(const MockService&) = delete;
  MockService& operator=(const MockService&) = delete;

  const std::string& sourceText() const { return text_; }

  // How many lines of the events file start with `start` ("connect", "GET ").
  std::size_t count(const std::string& start) const {
    std::istringstream in(readText(events_));
    std::size_t found = 0;
    for (std::string line; std::getline(in, line);) {
      found += line.rfind(start, 0) == 0 ? 1 : 0;
    }
    return found;
  }

 private:
  std::string dir_;
  std::string credentials_;
  std::string events_;
  std::string port_;
  std::string text_;
  pid_t pid_ = -1;
};

void RedfishWalkOfABladeEnclosure(benchmark::State& state) {
  std::unique_ptr<MockService> mock;
  try {
    mock = std::make_unique<MockService>();
  } catch (const std::exception& error) {
    state.SkipWithError(error.what());
    return;
  }
  const std::unique_ptr<Kesta::platform::InstrumentationSource> source =
      Kesta::platform::makeRedfishSource(mock->sourceText());
  // One walk first: it loads the plug-in, which later walks find loaded.
  std::size_t lights = source->readNodes().size();
  const std::size_t handshakes = mock->count("connect");
  const std::size_t requests = mock->count("GET ");
  // The loop variable is Google Benchmark's idiom; the analyzer takes it for a dead store.
  for (auto _ : state) {  // NOLINT(clang-analyzer-deadcode.DeadStores)
    const std::vector<Kesta::platform::InstrumentationNode> nodes = source->readNodes();
    benchmark::DoNotOptimize(nodes.data());
    lights = nodes.size();
  }
  const auto walks = static_cast<double>(state.iterations());
  state.counters["lights"] = static_cast<double>(lights);
  state.counters["handshakes_per_walk"] =
      static_cast<double>(mock->count("connect") - handshakes) / walks;
  state.counters["requests_per_walk"] = static_cast<double>(mock->count("GET ") - requests) / walks;
}
BENCHMARK(RedfishWalkOfABladeEnclosure)->Unit(benchmark::kMillisecond)->UseRealTime();

}  // namespace

int main(int argc, char** argv) {
  // The source's log lines (there should be none) stay out of the table.
  ::setenv("VNLOG_SINK", "none", 1);
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
    return 1;
  }
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
