// The stand-alone logger: one process-wide sink chosen by VNLOG_SINK and a threshold from
// VNLOG_LEVEL.
#include <fcntl.h>
#include <pthread.h>
#include <signal.h>
#include <sys/stat.h>
#include <syslog.h>
#include <unistd.h>

#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <ctime>
#include <limits>
#include <mutex>
#include <string>
#include <vector>

#include "KestaCommonBase.h"
#include "VNLog.h"
#include "logging/LogFormat.h"
#include "os/FileIo.h"
#include "text/Text.h"

namespace VNLog {

namespace {

using Kesta::platform::LineKind;
using Kesta::platform::UniqueFd;

// The threshold is kept as a long long so that two values outside the range of any int level
// can mean "not read yet" and "nothing passes" (the none sink) without a second atomic.
constexpr long long kUnconfigured = std::numeric_limits<long long>::min();
constexpr long long kSilent = std::numeric_limits<long long>::max();

// The logger's notes about its own configuration go out under this category, at this level.
constexpr const char* kLoggerCategory = "Kesta.Platform.Log";
constexpr int kNoteLevel = 6000;

enum class SinkKind { kNone, kStderr, kFile, kSyslog };

// Keeps SIGPIPE from ending the process while a line is written to a pipe whose reader has gone
// (stderr of a daemon started from a shell pipeline, or a FIFO as log file). The signal is
// blocked in this thread for the write, and one raised by the write is taken off again before
// the previous mask comes back.
class SigpipeGuard {
 public:
  SigpipeGuard() noexcept {
    sigemptyset(&pipeOnly_);
    sigaddset(&pipeOnly_, SIGPIPE);
    sigset_t pending;
    sigemptyset(&pending);
    // A SIGPIPE that was already pending is somebody else's and must stay pending.
    alreadyPending_ = sigpending(&pending) == 0 && sigismember(&pending, SIGPIPE) == 1;
    blocked_ = pthread_sigmask(SIG_BLOCK, &pipeOnly_, &previous_) == 0;
  }
  ~SigpipeGuard() {
    if (!blocked_) {
      return;
    }
    if (raised_ && !alreadyPending_) {
      const timespec noWait = {0, 0};
      while (sigtimedwait(&pipeOnly_, nullptr, &noWait) < 0 && errno == EINTR) {
      }
    }
    pthread_sigmask(SIG_SETMASK, &previous_, nullptr);
  }
  SigpipeGuard(const SigpipeGuard&) = delete;
  SigpipeGuard& operator=(const SigpipeGuard&) = delete;

  void writeFailedWith(int error) noexcept { raised_ = raised_ || error == EPIPE; }

 private:
  sigset_t pipeOnly_;
  sigset_t previous_;
  bool alreadyPending_ = false;
  bool blocked_ = false;
  bool raised_ = false;
};

// Writes to a regular file: no SIGPIPE can come of it, so the three signal-mask calls of the
// guard (more than the write itself costs) are left out.
void writeLineToRegularFile(int fd, const std::string& line) noexcept {
  // A lost log line cannot be reported anywhere.
  (void)Kesta::platform::writeAll(fd, line.data(), line.size());
}

void writeLine(int fd, const std::string& line) noexcept {
  SigpipeGuard guard;
  if (!Kesta::platform::writeAll(fd, line.data(), line.size())) {
    // A lost log line cannot be reported anywhere; only the signal needs undoing.
    guard.writeFailedWith(errno);
  }
}

class Logger {
 public:
  constexpr Logger() noexcept = default;
  ~Logger() {
    // Lines written while the process exits (or the library is unloaded) are dropped instead of
    // going to a descriptor that may already belong to someone else.
    std::lock_guard<std::mutex> lock(mutex_);
    threshold_.store(kSilent, std::memory_order_release);
    sink_ = SinkKind::kNone;
    file_.reset();
  }
  Logger(const Logger&) = delete;
  Logger& operator=(const Logger&) = delete;

  bool isEnabled(int level) { return level >= threshold(); }

  void write(const std::string& category, int level, LineKind kind, const std::string& text) {
    if (!isEnabled(level)) {
      return;
    }
    std::lock_guard<std::mutex> lock(mutex_);
    // reconfigure() may have raised the threshold since the check above.
    if (level < threshold_.load(std::memory_order_relaxed)) {
      return;
    }
    emitLocked(category, level, kind, text);
  }

  void reconfigure() {
    std::lock_guard<std::mutex> lock(mutex_);
    configureLocked();
  }

 private:
  long long threshold() {
    const long long threshold = threshold_.load(std::memory_order_acquire);
    if (threshold != kUnconfigured) {
      return threshold;
    }
    std::lock_guard<std::mutex> lock(mutex_);
    if (threshold_.load(std::memory_order_relaxed) == kUnconfigured) {
      configureLocked();
    }
    return threshold_.load(std::memory_order_relaxed);
  }

  void configureLocked() {
    std::vector<std::string> notes;

    long long threshold = Kesta::platform::kDefaultLogThreshold;
    const char* levelText = std::getenv("VNLOG_LEVEL");
    if (levelText != nullptr && *levelText != '\0') {
      if (const auto parsed = Kesta::platform::parseLogThreshold(levelText)) {
        threshold = *parsed;
      } else {
        notes.push_back("VNLOG_LEVEL \"" + Kesta::platform::printable(levelText) +
                        "\" is not a whole number; using " +
                        std::to_string(Kesta::platform::kDefaultLogThreshold));
      }
    }

    // The file is reopened on every reconfiguration, which also lets a rotated log file be
    // picked up.
    file_.reset();
    const char* sinkValue = std::getenv("VNLOG_SINK");
    const std::string sinkText = Kesta::stripSpaces(sinkValue != nullptr ? sinkValue : "");
    if (sinkText.empty() || sinkText == "syslog") {
      sink_ = SinkKind::kSyslog;
    } else if (sinkText == "stderr") {
      sink_ = SinkKind::kStderr;
    } else if (sinkText == "none") {
      sink_ = SinkKind::kNone;
    } else if (sinkText.compare(0, 5, "file:") == 0) {
      openFileLocked(sinkText.substr(5), notes);
    } else {
      sink_ = SinkKind::kStderr;
      notes.push_back("VNLOG_SINK \"" + Kesta::platform::printable(sinkText) +
                      "\" is not file:<path>, stderr, syslog or none; writing to standard error");
    }

    threshold_.store(sink_ == SinkKind::kNone ? kSilent : threshold, std::memory_order_release);
    // Notes about the configuration pass whatever the threshold: a logger that is set up wrongly
    // must say so.
    for (const std::string& note : notes) {
      emitLocked(kLoggerCategory, kNoteLevel, LineKind::kLog, note);
    }
  }

  void openFileLocked(const std::string& path, std::vector<std::string>& notes) {
    if (path.empty()) {
      sink_ = SinkKind::kStderr;
      notes.emplace_back("VNLOG_SINK names no file after \"file:\"; writing to standard error");
      return;
    }
    // O_NONBLOCK only keeps open() from waiting for a reader when the path is a FIFO; it is
    // cleared again right after so that writes never drop lines on a full pipe.
    UniqueFd fd(::open(path.c_str(),
                       O_WRONLY | O_APPEND | O_CREAT | O_CLOEXEC | O_NOCTTY | O_NONBLOCK, 0640));
    if (!fd) {
      const int error = errno;
      sink_ = SinkKind::kStderr;
      notes.push_back("cannot open log file \"" + Kesta::platform::printable(path) + "\": " +
                      Kesta::platform::errorText(error) + "; writing to standard error instead");
      return;
    }
    const int flags = ::fcntl(fd.get(), F_GETFL);
    if (flags >= 0) {
      ::fcntl(fd.get(), F_SETFL, flags & ~O_NONBLOCK);
    }
    struct stat info = {};
    fileIsRegular_ = ::fstat(fd.get(), &info) == 0 && S_ISREG(info.st_mode);
    file_ = std::move(fd);
    sink_ = SinkKind::kFile;
  }

  void emitLocked(const std::string& category, int level, LineKind kind, const std::string& text) {
    switch (sink_) {
      case SinkKind::kNone:
        return;
      case SinkKind::kStderr:
        writeLine(STDERR_FILENO, Kesta::platform::formatLogLine(category, level, kind, text));
        return;
      case SinkKind::kFile:
        if (fileIsRegular_) {
          writeLineToRegularFile(file_.get(),
                                 Kesta::platform::formatLogLine(category, level, kind, text));
        } else {
          writeLine(file_.get(), Kesta::platform::formatLogLine(category, level, kind, text));
        }
        return;
      case SinkKind::kSyslog:
        // No openlog(): the ident and facility belong to the process that loaded us.
        ::syslog(Kesta::platform::syslogPriority(level, kind), "%s",
                 Kesta::platform::formatSyslogMessage(category, level, kind, text).c_str());
        return;
    }
  }

  std::mutex mutex_;
  std::atomic<long long> threshold_{kUnconfigured};
  SinkKind sink_ = SinkKind::kNone;  // guarded by mutex_
  UniqueFd file_;                    // guarded by mutex_
  bool fileIsRegular_ = false;       // guarded by mutex_; file_ is a regular file
};

// Constant-initialised, so it is usable from any other static initialiser.
Logger logger;

}  // namespace

void VNLogger::logLevelMessage(const char* /*function*/, const char* /*file*/, int /*line*/,
                               const std::string& category, int level, char* /*reserved*/,
                               int /*reserved1*/, int /*reserved2*/, const std::string& message) {
  logger.write(category, level, LineKind::kLog, message);
}

void VNLogger::traceLevelMessage(const char* /*function*/, const char* /*file*/, int /*line*/,
                                 const std::string& category, int level, char* /*reserved*/,
                                 int /*reserved1*/, int /*reserved2*/, const std::string& message) {
  logger.write(category, level, LineKind::kTrace, message);
}

bool VNLogger::isEnabled(int level) { return logger.isEnabled(level); }

void VNLogger::reconfigure() { logger.reconfigure(); }

}  // namespace VNLog
