// VNLog::VNLogger: sinks, threshold, the exact line format, fall-backs and concurrent writers.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <syslog.h>
#include <unistd.h>

#include <atomic>
#include <map>
#include <string>
#include <thread>
#include <vector>

#include "PlatformTestSupport.h"
#include "VNLog.h"
#include "logging/LogFormat.h"
#include "os/FileIo.h"

namespace {

using platform_test::writeFileIn;
using testsupport::LogCapture;
using testsupport::ScopedEnv;
using testsupport::TempDir;
using VNLog::VNLogger;

void log(const std::string& category, int level, const std::string& text) {
  VNLogger::logLevelMessage(__func__, __FILE__, __LINE__, category, level, nullptr, 0, 0, text);
}

void trace(const std::string& category, int level, const std::string& text) {
  VNLogger::traceLevelMessage(__func__, __FILE__, __LINE__, category, level, nullptr, 0, 0, text);
}

// Runs `body` with standard error redirected into a file and returns what was written there.
template <typename Body>
std::string captureStderr(Body body) {
  TempDir dir;
  const Kesta::platform::UniqueFd file(
      ::open((dir.file("stderr")).c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0600));
  const Kesta::platform::UniqueFd saved(::dup(STDERR_FILENO));
  ::dup2(file.get(), STDERR_FILENO);
  body();
  ::dup2(saved.get(), STDERR_FILENO);
  return testsupport::readFile(dir.file("stderr"));
}

TEST(Logger, WritesTheExactLineFormat) {
  LogCapture capture(3000);
  log("Varnel.BlueLightProvider", 3000, "ENTERING: BlueLight_GetInstance() in BlueLightProvider");
  trace("Varnel.BlueLightProvider", 3000, "ENTERING: BlueLight_GetInstance() in BlueLightProvider");
  EXPECT_EQ(testsupport::readFile(capture.file()),
            "Varnel.BlueLightProvider\t3000\tLOG\tENTERING: BlueLight_GetInstance() in "
            "BlueLightProvider\n"
            "Varnel.BlueLightProvider\t3000\tTRACE\tENTERING: BlueLight_GetInstance() in "
            "BlueLightProvider\n");
}

TEST(Logger, DefaultThresholdIs6000) {
  LogCapture capture;
  ScopedEnv level("VNLOG_LEVEL", std::nullopt);
  VNLogger::reconfigure();
  log("C", 3000, "entry");
  log("C", 5999, "almost");
  log("C", 6000, "failure");
  trace("C", 7000, "worse");
  EXPECT_EQ(testsupport::readFile(capture.file()),
            "C\t6000\tLOG\tfailure\nC\t7000\tTRACE\tworse\n");
  EXPECT_FALSE(VNLogger::isEnabled(5999));
  EXPECT_TRUE(VNLogger::isEnabled(6000));
}

TEST(Logger, ThresholdFromTheEnvironment) {
  LogCapture capture(4000);
  log("C", 3999, "dropped");
  log("C", 4000, "kept");
  EXPECT_EQ(testsupport::readFile(capture.file()), "C\t4000\tLOG\tkept\n");
  EXPECT_TRUE(VNLogger::isEnabled(4000));
  EXPECT_FALSE(VNLogger::isEnabled(3999));
}

TEST(Logger, NegativeAndSignedThresholds) {
  EXPECT_EQ(Kesta::platform::parseLogThreshold("-5"), -5);
  EXPECT_EQ(Kesta::platform::parseLogThreshold(" +3000 "), 3000);
  EXPECT_EQ(Kesta::platform::parseLogThreshold("3000x"), std::nullopt);
  EXPECT_EQ(Kesta::platform::parseLogThreshold(""), std::nullopt);
  EXPECT_EQ(Kesta::platform::parseLogThreshold("+-1"), std::nullopt);
  EXPECT_EQ(Kesta::platform::parseLogThreshold("99999999999"), std::nullopt);
}

TEST(Logger, InvalidThresholdFallsBackTo6000AndSaysSo) {
  LogCapture capture;
  ScopedEnv level("VNLOG_LEVEL", "lots");
  VNLogger::reconfigure();
  log("C", 5000, "dropped");
  log("C", 6000, "kept");
  EXPECT_EQ(testsupport::readFile(capture.file()),
            "Kesta.Platform.Log\t6000\tLOG\tVNLOG_LEVEL \"lots\" is not a whole number; using "
            "6000\n"
            "C\t6000\tLOG\tkept\n");
}

TEST(Logger, LineBreaksInsideATextStayOnOneLine) {
  LogCapture capture;
  log("C", 6000, "two\nlines\r\n");
  EXPECT_EQ(testsupport::readFile(capture.file()), "C\t6000\tLOG\ttwo\\nlines\\r\\n\n");
}

TEST(Logger, AppendsToAnExistingFile) {
  TempDir dir;
  writeFileIn(dir.file("log"), "earlier\n");
  {
    ScopedEnv sink("VNLOG_SINK", "file:" + dir.file("log"));
    VNLogger::reconfigure();
    log("C", 6000, "later");
  }
  VNLogger::reconfigure();
  EXPECT_EQ(testsupport::readFile(dir.file("log")), "earlier\nC\t6000\tLOG\tlater\n");
}

TEST(Logger, CreatesAMissingFile) {
  TempDir dir;
  {
    ScopedEnv sink("VNLOG_SINK", "file:" + dir.file("new.log"));
    VNLogger::reconfigure();
    log("C", 6000, "first");
  }
  VNLogger::reconfigure();
  EXPECT_EQ(testsupport::readFile(dir.file("new.log")), "C\t6000\tLOG\tfirst\n");
}

TEST(Logger, StderrSink) {
  ScopedEnv sink("VNLOG_SINK", "stderr");
  const std::string written = captureStderr([] {
    VNLogger::reconfigure();
    log("Kesta.Platform.Instrumentation", 6000, "to stderr");
    trace("Kesta.Platform.Instrumentation", 6000, "and again");
  });
  EXPECT_EQ(written,
            "Kesta.Platform.Instrumentation\t6000\tLOG\tto stderr\n"
            "Kesta.Platform.Instrumentation\t6000\tTRACE\tand again\n");
}

TEST(Logger, NoneSinkWritesNothingAndEnablesNothing) {
  ScopedEnv sink("VNLOG_SINK", "none");
  ScopedEnv level("VNLOG_LEVEL", "0");
  const std::string written = captureStderr([] {
    VNLogger::reconfigure();
    log("C", 9000, "nothing");
  });
  EXPECT_EQ(written, "");
  EXPECT_FALSE(VNLogger::isEnabled(1000000));
}

TEST(Logger, UnopenableFileFallsBackToStderrWithOneLine) {
  TempDir dir;
  const std::string path = dir.file("no/such/folder/log");
  ScopedEnv sink("VNLOG_SINK", "file:" + path);
  const std::string written = captureStderr([] {
    VNLogger::reconfigure();
    log("C", 6000, "still visible");
  });
  EXPECT_EQ(written, "Kesta.Platform.Log\t6000\tLOG\tcannot open log file \"" + path +
                         "\": No such file or directory; writing to standard error instead\n"
                         "C\t6000\tLOG\tstill visible\n");
}

TEST(Logger, DirectoryAsFileFallsBackToStderr) {
  TempDir dir;
  ScopedEnv sink("VNLOG_SINK", "file:" + dir.path());
  const std::string written = captureStderr([] { VNLogger::reconfigure(); });
  EXPECT_EQ(platform_test::splitLines(written).size(), 1u);
  EXPECT_NE(written.find("cannot open log file"), std::string::npos);
}

TEST(Logger, UnknownSinkFallsBackToStderrWithOneLine) {
  ScopedEnv sink("VNLOG_SINK", "carrier-pigeon");
  const std::string written = captureStderr([] { VNLogger::reconfigure(); });
  EXPECT_EQ(written,
            "Kesta.Platform.Log\t6000\tLOG\tVNLOG_SINK \"carrier-pigeon\" is not file:<path>, "
            "stderr, syslog or none; writing to standard error\n");
}

TEST(Logger, EmptyFileNameFallsBackToStderr) {
  ScopedEnv sink("VNLOG_SINK", "file:");
  const std::string written = captureStderr([] { VNLogger::reconfigure(); });
  EXPECT_EQ(written,
            "Kesta.Platform.Log\t6000\tLOG\tVNLOG_SINK names no file after \"file:\"; writing to "
            "standard error\n");
}

TEST(Logger, SyslogIsTheDefaultAndWritesNothingElsewhere) {
  ScopedEnv sink("VNLOG_SINK", std::nullopt);
  const std::string written = captureStderr([] {
    VNLogger::reconfigure();
    log("C", 6000, "to syslog");
  });
  EXPECT_EQ(written, "");
  EXPECT_TRUE(VNLogger::isEnabled(6000));
}

TEST(Logger, SyslogPriorities) {
  using Kesta::platform::LineKind;
  using Kesta::platform::syslogPriority;
  EXPECT_EQ(syslogPriority(6000, LineKind::kLog), LOG_ERR);
  EXPECT_EQ(syslogPriority(9000, LineKind::kLog), LOG_ERR);
  EXPECT_EQ(syslogPriority(5000, LineKind::kLog), LOG_WARNING);
  EXPECT_EQ(syslogPriority(4000, LineKind::kLog), LOG_NOTICE);
  EXPECT_EQ(syslogPriority(3000, LineKind::kLog), LOG_INFO);
  EXPECT_EQ(syslogPriority(2999, LineKind::kLog), LOG_DEBUG);
  EXPECT_EQ(syslogPriority(6000, LineKind::kTrace), LOG_DEBUG);
  EXPECT_EQ(
      Kesta::platform::formatSyslogMessage("Varnel.BlueLight", 3000, LineKind::kTrace, "a\nb"),
      "Varnel.BlueLight 3000 TRACE a\\nb");
}

TEST(Logger, ReconfigureSwitchesSinkAndThreshold) {
  TempDir dir;
  {
    ScopedEnv sink("VNLOG_SINK", "file:" + dir.file("one"));
    ScopedEnv level("VNLOG_LEVEL", "6000");
    VNLogger::reconfigure();
    log("C", 3000, "not yet");
    log("C", 6000, "one");
    {
      ScopedEnv sink2("VNLOG_SINK", "file:" + dir.file("two"));
      ScopedEnv level2("VNLOG_LEVEL", "3000");
      // Nothing changes until reconfigure() reads the environment again.
      log("C", 6000, "still one");
      VNLogger::reconfigure();
      log("C", 3000, "two");
    }
  }
  VNLogger::reconfigure();
  EXPECT_EQ(testsupport::readFile(dir.file("one")), "C\t6000\tLOG\tone\nC\t6000\tLOG\tstill one\n");
  EXPECT_EQ(testsupport::readFile(dir.file("two")), "C\t3000\tLOG\ttwo\n");
}

TEST(Logger, ReconfigurePicksUpARotatedFile) {
  TempDir dir;
  ScopedEnv sink("VNLOG_SINK", "file:" + dir.file("log"));
  VNLogger::reconfigure();
  log("C", 6000, "before rotation");
  ASSERT_EQ(::rename((dir.file("log")).c_str(), (dir.file("log.1")).c_str()), 0);
  VNLogger::reconfigure();
  log("C", 6000, "after rotation");
  EXPECT_EQ(testsupport::readFile(dir.file("log.1")), "C\t6000\tLOG\tbefore rotation\n");
  EXPECT_EQ(testsupport::readFile(dir.file("log")), "C\t6000\tLOG\tafter rotation\n");
}

TEST(Logger, ConcurrentWritersNeverInterleave) {
  LogCapture capture;
  constexpr int kThreads = 8;
  constexpr int kLinesEach = 2000;
  std::vector<std::thread> threads;
  threads.reserve(kThreads);
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([t] {
      // Long lines make torn writes likely if writes were not whole lines.
      const std::string payload(300 + t * 50, static_cast<char>('a' + t));
      for (int i = 0; i < kLinesEach; ++i) {
        if (i % 2 == 0) {
          log("Thread" + std::to_string(t), 6000, std::to_string(i) + ":" + payload);
        } else {
          trace("Thread" + std::to_string(t), 6000, std::to_string(i) + ":" + payload);
        }
        VNLogger::isEnabled(6000);
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  const std::vector<std::string> lines = platform_test::rawLines(capture);
  ASSERT_EQ(lines.size(), static_cast<std::size_t>(kThreads * kLinesEach));
  std::map<int, int> perThread;
  for (const std::string& line : lines) {
    ASSERT_EQ(line.compare(0, 6, "Thread"), 0) << line;
    const int t = line[6] - '0';
    ASSERT_GE(t, 0);
    ASSERT_LT(t, kThreads);
    const std::string payload(300 + t * 50, static_cast<char>('a' + t));
    const std::string prefix = "Thread" + std::to_string(t) + "\t6000\t";
    ASSERT_EQ(line.compare(0, prefix.size(), prefix), 0) << line;
    ASSERT_EQ(line.substr(line.size() - payload.size()), payload) << line;
    ++perThread[t];
  }
  for (int t = 0; t < kThreads; ++t) {
    EXPECT_EQ(perThread[t], kLinesEach);
  }
}

TEST(Logger, ReconfigureWhileOthersWrite) {
  TempDir dir;
  ScopedEnv sink("VNLOG_SINK", "file:" + dir.file("log"));
  VNLogger::reconfigure();
  std::atomic<bool> stop{false};
  std::vector<std::thread> writers;
  writers.reserve(4);
  for (int t = 0; t < 4; ++t) {
    writers.emplace_back([&stop] {
      while (!stop.load()) {
        log("C", 6000, "line");
      }
    });
  }
  for (int i = 0; i < 200; ++i) {
    VNLogger::reconfigure();
  }
  stop = true;
  for (std::thread& writer : writers) {
    writer.join();
  }
  for (const std::string& line :
       platform_test::splitLines(testsupport::readFile(dir.file("log")))) {
    ASSERT_EQ(line, "C\t6000\tLOG\tline");
  }
}

TEST(Logger, AClosedPipeOnStderrDoesNotEndTheProcess) {
  int pipeFds[2];
  ASSERT_EQ(::pipe(pipeFds), 0);
  ::close(pipeFds[0]);
  const Kesta::platform::UniqueFd writeEnd(pipeFds[1]);
  const Kesta::platform::UniqueFd saved(::dup(STDERR_FILENO));
  ScopedEnv sink("VNLOG_SINK", "stderr");
  ::dup2(writeEnd.get(), STDERR_FILENO);
  VNLogger::reconfigure();
  log("C", 6000, "into a broken pipe");
  ::dup2(saved.get(), STDERR_FILENO);
  SUCCEED();
}

}  // namespace
