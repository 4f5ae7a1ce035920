#include "TestSupport.h"

#include <stdlib.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <regex>
#include <sstream>
#include <stdexcept>

#include "VNLog.h"
#include "text/Text.h"

namespace testsupport {

TempDir::TempDir() {
  std::string pattern = (std::filesystem::temp_directory_path() / "bluelight-test-XXXXXX").string();
  if (mkdtemp(pattern.data()) == nullptr) throw std::runtime_error("mkdtemp failed");
  path_ = pattern;
}

TempDir::~TempDir() {
  std::error_code ignored;
  std::filesystem::remove_all(path_, ignored);
}

ScopedEnv::ScopedEnv(std::string name, const std::optional<std::string>& value)
    : name_(std::move(name)) {
  if (const char* old = getenv(name_.c_str())) previous_ = old;
  if (value) {
    setenv(name_.c_str(), value->c_str(), 1);
  } else {
    unsetenv(name_.c_str());
  }
}

ScopedEnv::~ScopedEnv() {
  if (previous_) {
    setenv(name_.c_str(), previous_->c_str(), 1);
  } else {
    unsetenv(name_.c_str());
  }
}

Node blueLight(const std::string& path, std::optional<unsigned> status,
               std::optional<unsigned> alarmState, const std::string& description) {
  Node node;
  node.path = path;
  node.status = status;
  node.description = description;
  if (alarmState) node.properties[1] = *alarmState;
  return node;
}

std::string treeJson(const std::vector<Node>& nodes) {
  using Kesta::platform::quoted;
  using Kesta::platform::QuoteStyle;
  std::ostringstream out;
  out << "{\"nodes\": [";
  for (std::size_t i = 0; i < nodes.size(); ++i) {
    const Node& node = nodes[i];
    if (i != 0) out << ",";
    out << "\n  {\"type\": " << node.type << ", \"path\": " << quoted(node.path, QuoteStyle::kJson)
        << ", \"description\": " << quoted(node.description, QuoteStyle::kJson);
    if (node.status) out << ", \"status\": " << *node.status;
    if (!node.properties.empty()) {
      out << ", \"properties\": {";
      bool first = true;
      for (const auto& [number, value] : node.properties) {
        if (!first) out << ", ";
        first = false;
        out << "\"" << number << "\": " << value;
      }
      out << "}";
    }
    out << "}";
  }
  out << "\n]}\n";
  return out.str();
}

void writeTree(const std::string& file, const std::vector<Node>& nodes) {
  writeFile(file, treeJson(nodes));
}

void writeFile(const std::string& file, const std::string& text) {
  std::ofstream out(file, std::ios::binary | std::ios::trunc);
  out << text;
  if (!out) throw std::runtime_error("cannot write " + file);
}

std::string readFile(const std::string& file) {
  std::ifstream in(file, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

void writeLightTree(const std::string& file, unsigned count) {
  std::ofstream out(file, std::ios::binary | std::ios::trunc);
  out << "{\"nodes\": [";
  for (unsigned i = 1; i <= count; ++i) {
    if (i != 1) out << ",";
    out << "{\"type\":26,\"path\":\"1." << i
        << "\",\"description\":\"Blue Light\",\"status\":1,\"properties\":{\"1\":" << (i % 3 + 1)
        << "}}";
  }
  out << "]}\n";
  if (!out) throw std::runtime_error("cannot write " + file);
}

LogCapture::LogCapture(int threshold) : file_(dir_.file("log.txt")) {
  writeFile(file_, "");
  sink_.emplace("VNLOG_SINK", "file:" + file_);
  level_.emplace("VNLOG_LEVEL", std::to_string(threshold));
  VNLog::VNLogger::reconfigure();
}

LogCapture::~LogCapture() {
  // The environment is restored first, so the logger goes back to what it was before.
  sink_.reset();
  level_.reset();
  VNLog::VNLogger::reconfigure();
}

void LogCapture::clear() {
  if (truncate(file_.c_str(), 0) != 0) throw std::runtime_error("cannot empty " + file_);
}

std::vector<LogLine> LogCapture::lines() const {
  std::vector<LogLine> result;
  std::istringstream in(readFile(file_));
  std::string line;
  while (std::getline(in, line)) {
    LogLine parsed;
    std::istringstream fields(line);
    std::string level;
    std::getline(fields, parsed.category, '\t');
    std::getline(fields, level, '\t');
    std::getline(fields, parsed.kind, '\t');
    std::getline(fields, parsed.text);
    parsed.level = static_cast<int>(std::strtol(level.c_str(), nullptr, 10));
    result.push_back(parsed);
  }
  return result;
}

std::vector<LogLine> LogCapture::lines(const std::string& category) const {
  std::vector<LogLine> result;
  for (const LogLine& line : lines()) {
    if (line.category == category) result.push_back(line);
  }
  return result;
}

std::vector<std::string> LogCapture::texts(const std::string& category,
                                           const std::string& kind) const {
  std::vector<std::string> result;
  for (const LogLine& line : lines(category)) {
    if (line.kind == kind) result.push_back(line.text);
  }
  return result;
}

std::ostream& operator<<(std::ostream& out, const LogLine& line) {
  return out << line.category << " " << line.level << " " << line.kind << " \"" << line.text
             << "\"";
}

std::string maskPointers(const std::string& text) {
  static const std::regex pointer("0x[0-9a-fA-F]+");
  return std::regex_replace(text, pointer, "PTR");
}

std::string maskLineNumbers(const std::string& text) {
  static const std::regex line("Line: [0-9]+");
  return std::regex_replace(text, line, "Line: N");
}

}  // namespace testsupport
