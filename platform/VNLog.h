// The platform's logging library as the module uses it: a logger with two static entry points
// (log level and trace level) and a message buffer that collects the text of one line.
#ifndef KESTA_PLATFORM_VNLOG_H
#define KESTA_PLATFORM_VNLOG_H

#include <ostream>
#include <sstream>
#include <string>

namespace VNLog {

// Collects the text of one message. The buffer is a stream: everything a std::ostream can
// write can be written into it. str() takes the collected text out and leaves the buffer empty
// and in a good state, ready for the next message.
class VNMessageBuffer {
 public:
  VNMessageBuffer();
  ~VNMessageBuffer();
  VNMessageBuffer(const VNMessageBuffer&) = delete;
  VNMessageBuffer& operator=(const VNMessageBuffer&) = delete;

  // Writes a character string; a null pointer writes nothing and puts the stream into its
  // failed state, exactly as std::ostream does, so that nothing more is written until str().
  VNMessageBuffer& operator<<(const char* text);

  // The underlying stream, for the standard inserters.
  operator std::ostream&();  // NOLINT(google-explicit-constructor)

  // The collected text of `buffer`; the buffer is emptied and its stream state cleared.
  static std::string str(VNMessageBuffer& buffer);
  // The collected text of a stream obtained from a VNMessageBuffer (emptied and cleared in the
  // same way); any other stream yields an empty string.
  static std::string str(std::ostream& stream);

 private:
  // A distinct stream type lets str(std::ostream&) recognise the streams that come from a
  // VNMessageBuffer and leave every other stream alone.
  class Stream final : public std::ostringstream {};

  static std::string take(Stream& stream);

  Stream stream_;
};

// The logger. Configuration comes from the environment (see the README):
//   VNLOG_SINK   file:<path> (append) | stderr | syslog | none   (default syslog)
//   VNLOG_LEVEL  threshold; a line is written when its level is at least this (default 6000)
// The configuration is read on first use and again by reconfigure(). Every entry point is safe
// for concurrent callers, and lines never interleave.
class VNLogger {
 public:
  // One line at log level ("LOG").
  static void logLevelMessage(const char* function, const char* file, int line,
                              const std::string& category, int level, char* reserved, int reserved1,
                              int reserved2, const std::string& message);
  // One line at trace level ("TRACE").
  static void traceLevelMessage(const char* function, const char* file, int line,
                                const std::string& category, int level, char* reserved,
                                int reserved1, int reserved2, const std::string& message);

  // True when a line of `level` would reach the sink; lets callers skip formatting lines that
  // would be dropped.
  static bool isEnabled(int level);

  // Re-reads VNLOG_SINK and VNLOG_LEVEL (closing a file sink that is no longer wanted).
  static void reconfigure();
};

}  // namespace VNLog

#endif  // KESTA_PLATFORM_VNLOG_H
