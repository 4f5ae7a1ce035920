// What the platform tests need beyond the shared helpers of tests/support: the raw lines of the
// log file (the platform's tests check the exact line format) and files in new folders.
#ifndef BLUELIGHT_TESTS_PLATFORM_SUPPORT_H
#define BLUELIGHT_TESTS_PLATFORM_SUPPORT_H

#include <filesystem>
#include <sstream>
#include <string>
#include <vector>

#include "TestSupport.h"

namespace platform_test {

inline std::vector<std::string> splitLines(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) {
    lines.push_back(line);
  }
  return lines;
}

// The log file's lines exactly as written, without their line ends.
inline std::vector<std::string> rawLines(const testsupport::LogCapture& capture) {
  return splitLines(testsupport::readFile(capture.file()));
}

// Writes a file, creating the folders on its way first.
inline void writeFileIn(const std::string& path, const std::string& text) {
  std::filesystem::create_directories(std::filesystem::path(path).parent_path());
  testsupport::writeFile(path, text);
}

}  // namespace platform_test

#endif  // BLUELIGHT_TESTS_PLATFORM_SUPPORT_H
