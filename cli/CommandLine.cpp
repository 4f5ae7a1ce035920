#include "CommandLine.h"

#include <cctype>
#include <map>
#include <string_view>

#include "PathText.h"
#include "ReturnCodes.h"
#include "TextForms.h"
#include "UsageError.h"
#include "text/Text.h"

namespace bluelight::cli {

namespace {

std::string trimmed(std::string_view text) {
  const std::size_t first = text.find_first_not_of(" \t");
  if (first == std::string_view::npos) return std::string();
  const std::size_t last = text.find_last_not_of(" \t");
  return std::string(text.substr(first, last - first + 1));
}

bool isNamespace(std::string_view text) {
  if (text.empty() || text.front() == '/' || text.back() == '/' ||
      text.find("//") != std::string_view::npos) {
    return false;
  }
  for (const char c : text) {
    if (!(std::isalnum(static_cast<unsigned char>(c)) || c == '_' || c == '/')) return false;
  }
  return true;
}

void setOnce(std::optional<std::string>& slot, const std::string& option, std::string value) {
  if (slot) throw UsageError(option + " is given more than once");
  slot = std::move(value);
}

// A class or property name for `option`; `what` says which in the message.
std::string cimName(const std::string& option, const std::string& value, const char* what) {
  if (!isCimName(value)) {
    throw UsageError(option + " needs " + what + " (letters, digits and \"_\"), not " +
                     quote(value));
  }
  return value;
}

CMPIrc failureCode(const std::string& value) {
  const std::optional<CMPIrc> code = parseReturnCode(value);
  if (!code) {
    throw UsageError(
        "--upcall-failure needs a CMPI return code, by name (e.g. "
        "CMPI_RC_ERR_ACCESS_DENIED or ERR_ACCESS_DENIED) or by number (e.g. 2), not " +
        quote(value));
  }
  if (*code == CMPI_RC_OK) throw UsageError("--upcall-failure needs an error code, not CMPI_RC_OK");
  return *code;
}

// Applies one option that takes a value.
void applyValueOption(const std::string& option, const std::string& value, bool& sawNamespace,
                      CommandLine& line) {
  if (option == "--namespace") {
    if (sawNamespace) throw UsageError("--namespace is given more than once");
    if (!isNamespace(value)) {
      throw UsageError("--namespace needs a namespace such as root/cimv2, not " + quote(value));
    }
    sawNamespace = true;
    line.nameSpace = value;
  } else if (option == "--properties") {
    if (line.properties) throw UsageError("--properties is given more than once");
    line.properties = parsePropertyList(value);
  } else if (option == "--assoc-class") {
    setOnce(line.assocClass, option, cimName(option, value, "a class name"));
  } else if (option == "--result-class") {
    setOnce(line.resultClass, option, cimName(option, value, "a class name"));
  } else if (option == "--role") {
    setOnce(line.role, option, cimName(option, value, "a property name"));
  } else if (option == "--result-role") {
    setOnce(line.resultRole, option, cimName(option, value, "a property name"));
  } else if (option == "--library") {
    if (value.empty()) throw UsageError("--library needs the path of the provider library");
    setOnce(line.library, option, value);
  } else if (option == "--computer-system") {
    if (value.empty()) throw UsageError("--computer-system needs a name");
    line.computerSystems.push_back(value);
  } else if (option == "--upcall-failure") {
    if (line.upcallFailure) throw UsageError("--upcall-failure is given more than once");
    line.upcallFailure = failureCode(value);
  }
}

const std::map<std::string, bool>& knownOptions() {
  // The option and whether it takes a value.
  static const std::map<std::string, bool> options = {
      {"--namespace", true},
      {"--properties", true},
      {"--assoc-class", true},
      {"--result-class", true},
      {"--role", true},
      {"--result-role", true},
      {"--json", false},
      {"--verbose", false},
      {"--library", true},
      {"--computer-system", true},
      {"--no-computer-system", false},
      {"--upcall-failure", true},
      {"--help", false},
      {"--version", false},
  };
  return options;
}

// Refuses options that the operation has no parameter for, and lets --assoc-class name the
// association class of References and ReferenceNames, whose ResultClass parameter is just that.
void checkAgainstOperation(CommandLine& line) {
  const OperationInfo& info = infoOf(line.operation);
  const std::string name = info.longName;
  auto refuse = [&](const char* option) {
    throw UsageError(std::string(option) + " does not apply to " + name);
  };
  if (line.properties && !info.takesProperties) refuse("--properties");
  if (!info.isAssociation) {
    if (line.assocClass) refuse("--assoc-class");
    if (line.resultClass) refuse("--result-class");
    if (line.role) refuse("--role");
    if (line.resultRole) refuse("--result-role");
    return;
  }
  if (info.takesAssocClass) return;
  if (line.resultRole) refuse("--result-role");
  if (line.assocClass) {
    if (line.resultClass &&
        !Kesta::platform::equalsIgnoringCase(*line.resultClass, *line.assocClass)) {
      throw UsageError("--assoc-class and --result-class both name the association class of " +
                       name + " and must agree");
    }
    line.resultClass = line.assocClass;
    line.assocClass.reset();
  }
}

void checkComputerSystems(const CommandLine& line) {
  if (line.noComputerSystem && !line.computerSystems.empty()) {
    throw UsageError("--no-computer-system and --computer-system exclude each other");
  }
  if (line.upcallFailure && (line.noComputerSystem || !line.computerSystems.empty())) {
    throw UsageError(
        "--upcall-failure makes the computer-system up-calls fail; it cannot be combined with "
        "--computer-system or --no-computer-system");
  }
}

// discover takes no argument and only the options that say how to show what it finds.
void checkDiscover(const CommandLine& line, const std::vector<std::string>& positional) {
  if (positional.size() > 1) throw UsageError("unexpected argument " + quote(positional[1]));
  auto refuse = [](const char* option) {
    throw UsageError(std::string(option) + " does not apply to discover");
  };
  if (line.nameSpace != kDefaultNamespace) refuse("--namespace");
  if (line.properties) refuse("--properties");
  if (line.assocClass) refuse("--assoc-class");
  if (line.resultClass) refuse("--result-class");
  if (line.role) refuse("--role");
  if (line.resultRole) refuse("--result-role");
  if (!line.computerSystems.empty()) refuse("--computer-system");
  if (line.noComputerSystem) refuse("--no-computer-system");
  if (line.upcallFailure) refuse("--upcall-failure");
}

}  // namespace

std::vector<std::string> parsePropertyList(const std::string& text) {
  std::vector<std::string> names;
  if (trimmed(text).empty()) return names;
  std::size_t start = 0;
  while (true) {
    const std::size_t comma = text.find(',', start);
    const std::string name = trimmed(std::string_view(text).substr(
        start, comma == std::string::npos ? std::string::npos : comma - start));
    if (name.empty()) {
      throw UsageError("--properties has an empty name in " + quote(text) +
                       " (use --properties '' for the empty list)");
    }
    if (!isCimName(name)) {
      throw UsageError("--properties: " + quote(name) + " is not a property name");
    }
    names.push_back(name);
    if (comma == std::string::npos) return names;
    start = comma + 1;
  }
}

CommandLine parseCommandLine(const std::vector<std::string>& arguments) {
  CommandLine line;
  for (const std::string& argument : arguments) {
    if (argument == "--") break;
    if (argument == "--help" || argument == "-h") {
      line.action = CommandLine::Action::Help;
      return line;
    }
  }
  for (const std::string& argument : arguments) {
    if (argument == "--") break;
    if (argument == "--version") {
      line.action = CommandLine::Action::Version;
      return line;
    }
  }

  std::vector<std::string> positional;
  bool sawNamespace = false;
  bool optionsEnded = false;
  for (std::size_t index = 0; index < arguments.size(); ++index) {
    const std::string& argument = arguments[index];
    if (optionsEnded || argument.size() < 2 || argument[0] != '-') {
      positional.push_back(argument);
      continue;
    }
    if (argument == "--") {
      optionsEnded = true;
      continue;
    }
    const std::size_t equals = argument.find('=');
    const std::string option = argument.substr(0, equals);
    const auto known = knownOptions().find(option);
    if (known == knownOptions().end()) {
      throw UsageError("unknown option " + quote(option));
    }
    const bool takesValue = known->second;
    if (!takesValue) {
      if (equals != std::string::npos) throw UsageError(option + " takes no value");
      if (option == "--json") line.json = true;
      if (option == "--verbose") line.verbose = true;
      if (option == "--no-computer-system") line.noComputerSystem = true;
      continue;
    }
    std::string value;
    if (equals != std::string::npos) {
      value = argument.substr(equals + 1);
    } else {
      if (index + 1 >= arguments.size()) throw UsageError(option + " needs a value");
      value = arguments[++index];
    }
    applyValueOption(option, value, sawNamespace, line);
  }

  if (positional.empty()) {
    throw UsageError("no operation given (discover, ei, ein, gi, ai, ain, ri or rin)");
  }
  if (Kesta::platform::equalsIgnoringCase(positional[0], "discover")) {
    checkDiscover(line, positional);
    line.action = CommandLine::Action::Discover;
    return line;
  }
  const OperationInfo* info = findOperation(positional[0]);
  if (info == nullptr) {
    throw UsageError("unknown operation " + quote(positional[0]) +
                     "; the operations are discover, ei, ein, gi, ai, ain, ri and rin");
  }
  line.operation = info->operation;
  if (positional.size() < 2) {
    throw UsageError(std::string(info->longName) + " needs " +
                     (info->takesClassName ? "a class name" : "an object path"));
  }
  if (positional.size() > 2) throw UsageError("unexpected argument " + quote(positional[2]));
  line.argument = positional[1];

  checkAgainstOperation(line);
  checkComputerSystems(line);
  return line;
}

}  // namespace bluelight::cli
