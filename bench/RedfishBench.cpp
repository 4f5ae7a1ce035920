// One walk of a Redfish service through the real transport plug-in, as an operation of the
// provider makes it: the source reads its credentials file, opens one TLS connection and walks
// the service root, the Chassis collection, every chassis, storage resource and drive. The
// services are the mocks of tests/redfish-mock (python3 and its ssl module), started on a random
// loopback port with the mock's own fixture commands (fixture-start makes the certificates and
// the credentials file and returns once the mock listens; fixture-stop ends it):
//   RedfishWalk/RackServer      one chassis, eight drives: 11 GETs a walk, 9 lights
//   RedfishWalk/BladeEnclosure  four chassis, three storage, six drives: 15 GETs, 10 lights
//
//   bluelight-redfish-bench [google-benchmark options]
//
// Besides the time per walk, the counters say how many TLS handshakes and requests one walk
// cost, as the mock counted them.
#include <benchmark/benchmark.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/redfish/RedfishSource.h"

namespace {

std::string readText(const std::string& file) {
  std::ifstream in(file);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

// Runs the mock script with `arguments` to its end, its output going to `output`; its exit
// status, or -1.
int runMock(std::vector<std::string> arguments, const std::string& output) {
  arguments.insert(arguments.begin(), {REDFISH_BENCH_PYTHON, REDFISH_BENCH_MOCK});
  std::vector<char*> argv;
  argv.reserve(arguments.size() + 1);
  for (std::string& argument : arguments) {
    argv.push_back(argument.data());
  }
  argv.push_back(nullptr);
  const pid_t child = ::fork();
  if (child < 0) {
    return -1;
  }
  if (child == 0) {
    ::prctl(PR_SET_PDEATHSIG, SIGKILL);
    if (std::freopen(output.c_str(), "a", stdout) != nullptr) {
      ::dup2(STDOUT_FILENO, STDERR_FILENO);
    }
    ::execv(argv[0], argv.data());
    ::_exit(127);
  }
  int status = 0;
  while (::waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) {
      return -1;
    }
  }
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

// A mock service started by the mock's fixture-start in a temporary folder, for the life of the
// object.
class MockService {
 public:
  explicit MockService(const std::string& service) {
    std::string folder =
        (std::filesystem::temp_directory_path() / "bluelight-redfish-bench-XXXXXX").string();
    if (::mkdtemp(folder.data()) == nullptr) {
      throw std::runtime_error("cannot make a temporary folder");
    }
    dir_ = folder;
    const std::string log = dir_ + "/fixture.log";
    if (runMock({"fixture-start", "--dir", dir_, "--service",
                 std::string(REDFISH_BENCH_SERVICES) + "/" + service + ".json"},
                log) != 0) {
      throw std::runtime_error("the mock Redfish service did not start: " + readText(log) +
                               readText(dir_ + "/mock.log"));
    }
    std::string text = readText(dir_ + "/source.txt");
    if (!text.empty() && text.back() == '\n') {
      text.pop_back();
    }
    // The whole walk may take longer than the default 2 s on a loaded machine; the figure is
    // the time, not whether it fits.
    text_ = text + "&timeout=10";
  }

  ~MockService() {
    runMock({"fixture-stop", "--dir", dir_}, "/dev/null");
    std::error_code ignored;
    std::filesystem::remove_all(dir_, ignored);
  }

  MockService(const MockService&) = delete;
  MockService& operator=(const MockService&) = delete;

  const std::string& sourceText() const { return text_; }

  // How many lines of the mock's events start with `start` ("connect", "GET ").
  std::size_t count(const std::string& start) const {
    std::istringstream in(readText(dir_ + "/events.log"));
    std::size_t found = 0;
    for (std::string line; std::getline(in, line);) {
      found += line.rfind(start, 0) == 0 ? 1 : 0;
    }
    return found;
  }

 private:
  std::string dir_;
  std::string text_;
};

void RedfishWalk(benchmark::State& state, const std::string& service) {
  std::unique_ptr<MockService> mock;
  try {
    mock = std::make_unique<MockService>(service);
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
BENCHMARK_CAPTURE(RedfishWalk, RackServer, std::string("rack-server"))
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();
BENCHMARK_CAPTURE(RedfishWalk, BladeEnclosure, std::string("blade-enclosure"))
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();

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
