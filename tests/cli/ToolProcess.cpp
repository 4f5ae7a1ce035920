#include "ToolProcess.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>

#include <cerrno>
#include <stdexcept>

#include "TestSupport.h"

extern char** environ;

namespace clitest {

namespace {

// Variables the tests set themselves, so whatever the caller's shell has must not leak in.
bool isControlled(const std::string& entry) {
  const std::string name = entry.substr(0, entry.find('='));
  return name.rfind("KESTA_", 0) == 0 || name.rfind("VNLOG_", 0) == 0 || name == "LANG" ||
         name == "LANGUAGE" || name.rfind("LC_", 0) == 0;
}

// Closes the spawn attributes on every way out.
struct FileActions {
  posix_spawn_file_actions_t actions;
  FileActions() { posix_spawn_file_actions_init(&actions); }
  ~FileActions() { posix_spawn_file_actions_destroy(&actions); }
  FileActions(const FileActions&) = delete;
  FileActions& operator=(const FileActions&) = delete;
};

}  // namespace

ProcessResult runProcess(const std::string& program, const std::vector<std::string>& arguments,
                         const std::map<std::string, std::string>& environment) {
  testsupport::TempDir dir;
  const std::string outFile = dir.file("stdout");
  const std::string errFile = dir.file("stderr");

  FileActions files;
  posix_spawn_file_actions_addopen(&files.actions, 1, outFile.c_str(), O_WRONLY | O_CREAT | O_TRUNC,
                                   0600);
  posix_spawn_file_actions_addopen(&files.actions, 2, errFile.c_str(), O_WRONLY | O_CREAT | O_TRUNC,
                                   0600);

  std::vector<std::string> argumentTexts{program};
  argumentTexts.insert(argumentTexts.end(), arguments.begin(), arguments.end());
  std::vector<char*> argv;
  argv.reserve(argumentTexts.size() + 1);
  for (std::string& text : argumentTexts) argv.push_back(text.data());
  argv.push_back(nullptr);

  std::vector<std::string> environmentTexts;
  for (char** entry = environ; *entry != nullptr; ++entry) {
    if (!isControlled(*entry)) environmentTexts.emplace_back(*entry);
  }
  for (const auto& [name, value] : environment) {
    environmentTexts.push_back(std::string(name).append("=").append(value));
  }
  std::vector<char*> envp;
  envp.reserve(environmentTexts.size() + 1);
  for (std::string& text : environmentTexts) envp.push_back(text.data());
  envp.push_back(nullptr);

  pid_t child = 0;
  const int spawned =
      posix_spawn(&child, program.c_str(), &files.actions, nullptr, argv.data(), envp.data());
  if (spawned != 0) throw std::runtime_error("cannot start " + program);
  int status = 0;
  while (waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) throw std::runtime_error("waitpid failed");
  }

  ProcessResult result;
  result.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  result.out = testsupport::readFile(outFile);
  result.err = testsupport::readFile(errFile);
  return result;
}

}  // namespace clitest
