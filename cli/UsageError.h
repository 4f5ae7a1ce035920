// The errors that end a run before anything is loaded or after loading failed, each mapped to its
// own exit code by the tool.
#pragma once

#include <stdexcept>
#include <string>

namespace bluelight::cli {

/// The command line cannot be used as it stands (exit code 2). what() is the explanation shown
/// to the user, without the program name.
class UsageError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// The provider library or one of its MIs cannot be loaded (exit code 3).
class LoadFailure : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// No provider serves the class the operation is about (exit code 1).
class NoProviderError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

}  // namespace bluelight::cli
