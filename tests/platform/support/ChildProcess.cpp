#include "ChildProcess.h"

#include <fcntl.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <utility>

namespace platform_test {

pid_t spawnChild(std::vector<std::string> arguments, const std::string& output, int handOver,
                 int handOverAs) {
  std::vector<char*> argv;
  argv.reserve(arguments.size() + 1);
  for (std::string& argument : arguments) {
    argv.push_back(argument.data());
  }
  argv.push_back(nullptr);
  const pid_t parent = ::getpid();
  const pid_t child = ::fork();
  if (child != 0) {
    return child;
  }
  // dup2 clears close-on-exec; a descriptor that already has the number keeps its flag, which
  // is cleared by hand then.
  if (handOver >= 0 && handOver == handOverAs) {
    ::fcntl(handOverAs, F_SETFD, 0);
  } else if (handOver >= 0 && ::dup2(handOver, handOverAs) < 0) {
    ::_exit(126);
  }
  ::prctl(PR_SET_PDEATHSIG, SIGKILL);
  if (::getppid() != parent) {
    ::_exit(126);
  }
  const int out = ::open(output.c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600);
  const int in = ::open("/dev/null", O_RDONLY);
  if (out >= 0) {
    ::dup2(out, STDOUT_FILENO);
    ::dup2(out, STDERR_FILENO);
  }
  if (in >= 0) {
    ::dup2(in, STDIN_FILENO);
  }
  ::execv(argv[0], argv.data());
  ::_exit(127);
}

int waitForChild(pid_t child) {
  int status = 0;
  while (::waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) {
      return -1;
    }
  }
  return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

void killChild(pid_t child) {
  ::kill(child, SIGKILL);
  waitForChild(child);
}

int runChild(std::vector<std::string> arguments, const std::string& output) {
  const pid_t child = spawnChild(std::move(arguments), output);
  return child < 0 ? -1 : waitForChild(child);
}

}  // namespace platform_test
