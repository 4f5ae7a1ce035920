// The command line of bluelight-cli: options and the operation with its argument.
#pragma once

#include <cmpidt.h>
#include <cmpihost/request.h>

#include <optional>
#include <string>
#include <vector>

#include "Operation.h"

namespace bluelight::cli {

inline constexpr const char* kProgramName = "bluelight-cli";
inline constexpr const char* kDefaultNamespace = "root/cimv2";

struct CommandLine {
  /// Run: one CIM operation; Discover: the sources and the lights (`discover`).
  enum class Action { Run, Discover, Help, Version };
  Action action = Action::Run;

  Operation operation = Operation::EnumerateInstances;
  /// The class name or object path, as typed.
  std::string argument;

  std::string nameSpace = kDefaultNamespace;
  /// nullopt: all properties; an empty list: none besides the keys.
  cmpihost::PropertyList properties;
  std::optional<std::string> assocClass;
  std::optional<std::string> resultClass;
  std::optional<std::string> role;
  std::optional<std::string> resultRole;

  bool json = false;
  bool verbose = false;
  std::optional<std::string> library;

  /// Names of the KESTA_ComputerSystem instances the up-calls return; empty means this host's.
  std::vector<std::string> computerSystems;
  bool noComputerSystem = false;
  std::optional<CMPIrc> upcallFailure;
};

/// Reads the arguments (without the program name). Options may come before or after the
/// operation, as "--name value" or "--name=value"; "--" ends the options. --help and --version win
/// over everything else. Throws UsageError for anything that cannot be used, including options
/// that the operation does not take.
CommandLine parseCommandLine(const std::vector<std::string>& arguments);

/// The names of a --properties value: split at commas, blanks around names removed; "" is the
/// empty list. Throws UsageError for an empty name ("a,,b") or a name that is not a CIM name.
std::vector<std::string> parsePropertyList(const std::string& text);

}  // namespace bluelight::cli
