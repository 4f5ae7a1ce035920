// Helpers shared by the test suites: temporary folders, environment overrides, instrumentation
// trees written as JSON files, and capture of the log lines.
#ifndef BLUELIGHT_TESTS_SUPPORT_H
#define BLUELIGHT_TESTS_SUPPORT_H

#include <map>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

namespace testsupport {

// A fresh folder under the system's temporary directory, removed with everything in it.
class TempDir {
 public:
  TempDir();
  ~TempDir();
  TempDir(const TempDir&) = delete;
  TempDir& operator=(const TempDir&) = delete;

  const std::string& path() const { return path_; }
  // `name` inside the folder.
  std::string file(const std::string& name) const { return path_ + "/" + name; }

 private:
  std::string path_;
};

// Sets (or, with nullopt, unsets) an environment variable and restores it when destroyed.
class ScopedEnv {
 public:
  ScopedEnv(std::string name, const std::optional<std::string>& value);
  ~ScopedEnv();
  ScopedEnv(const ScopedEnv&) = delete;
  ScopedEnv& operator=(const ScopedEnv&) = delete;

 private:
  std::string name_;
  std::optional<std::string> previous_;
};

// One node of an instrumentation tree.
struct Node {
  unsigned type = 26;
  std::string path;
  std::string description = "Blue Light";
  std::optional<unsigned> status = 1u;
  std::map<unsigned, unsigned> properties;
};

// A blue light with a given path, status and alarm-state property.
Node blueLight(const std::string& path, std::optional<unsigned> status = 1u,
               std::optional<unsigned> alarmState = 2u,
               const std::string& description = "Blue Light");

// The JSON text of a tree of `nodes`.
std::string treeJson(const std::vector<Node>& nodes);
// Writes a tree to `file`.
void writeTree(const std::string& file, const std::vector<Node>& nodes);
// Writes `text` to `file` as it is.
void writeFile(const std::string& file, const std::string& text);
// The whole content of `file` ("" when it cannot be read).
std::string readFile(const std::string& file);

// A tree of `count` blue lights with paths "1.1", "1.2", ... (cheap to write, for big trees).
void writeLightTree(const std::string& file, unsigned count);

// One line of the log sink: category, level, kind (LOG or TRACE) and text.
struct LogLine {
  std::string category;
  int level = 0;
  std::string kind;
  std::string text;

  bool operator==(const LogLine& other) const {
    return category == other.category && level == other.level && kind == other.kind &&
           text == other.text;
  }
};

// For readable test failures.
std::ostream& operator<<(std::ostream& out, const LogLine& line);

// Points the logger at a file (VNLOG_SINK=file:..., VNLOG_LEVEL as given) for the lifetime of
// the object, and reads back the lines written since the last clear().
//
// The logger of code linked into the test reads its configuration again through reconfigure();
// a provider library loaded with dlopen has a logger of its own that reads the environment at its
// first line, so black-box tests create one LogCapture before loading the library and keep it.
class LogCapture {
 public:
  explicit LogCapture(int threshold = 0);
  ~LogCapture();
  LogCapture(const LogCapture&) = delete;
  LogCapture& operator=(const LogCapture&) = delete;

  // Forgets every line written so far (the file is emptied; writers append at its new end).
  void clear();
  // The lines written since the last clear(), in order.
  std::vector<LogLine> lines() const;
  // The lines of one category.
  std::vector<LogLine> lines(const std::string& category) const;
  // The texts of the lines of one category and kind ("LOG" or "TRACE").
  std::vector<std::string> texts(const std::string& category, const std::string& kind) const;
  const std::string& file() const { return file_; }

 private:
  TempDir dir_;
  std::string file_;
  std::optional<ScopedEnv> sink_;
  std::optional<ScopedEnv> level_;
};

// `text` with every non-null pointer value (0x followed by hex digits) replaced by "PTR", so lines
// can be compared exactly without knowing addresses. A null pointer prints as 0 and stays.
std::string maskPointers(const std::string& text);

// The line text with its "[Line: N]" or "Line: N" number replaced by "N".
std::string maskLineNumbers(const std::string& text);

}  // namespace testsupport

#endif  // BLUELIGHT_TESTS_SUPPORT_H
