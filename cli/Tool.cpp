#include "Tool.h"

#include <cstdlib>
#include <exception>
#include <optional>

#include "CommandLine.h"
#include "Discover.h"
#include "Dispatch.h"
#include "EnvironmentCheck.h"
#include "HelpText.h"
#include "JsonFormat.h"
#include "KestaCommonBase.h"
#include "LibraryLocation.h"
#include "Output.h"
#include "ProviderSession.h"
#include "UsageError.h"

namespace bluelight::cli {

namespace {

void sayError(std::ostream& err, const std::string& message) {
  err << kProgramName << ": error: " << message << "\n";
}

std::optional<std::string> libraryToLoad(const CommandLine& line, const ToolIo& io) {
  if (line.library) return line.library;
  const std::vector<std::string> candidates = libraryCandidates(io.executablePath);
  if (std::optional<std::string> found = firstExisting(candidates)) return found;
  sayError(io.err, std::string("the provider library ") + providerLibraryName() +
                       " was not found; looked for:");
  for (const std::string& candidate : candidates) io.err << "  " << candidate << "\n";
  io.err << "Name it with --library PATH.\n";
  return std::nullopt;
}

ComputerSystemAnswer computerSystems(const CommandLine& line) {
  ComputerSystemAnswer answer;
  answer.failure = line.upcallFailure;
  if (line.upcallFailure || line.noComputerSystem) return answer;
  // The same name the provider gives its lights, from the same platform code.
  answer.names = line.computerSystems.empty() ? std::vector<std::string>{Kesta::getSystemName()}
                                              : line.computerSystems;
  return answer;
}

void describeSetup(const ProviderSession& session, const ComputerSystemAnswer& systems,
                   std::ostream& err) {
  err << "library: " << session.libraryPath() << "\n";
  if (systems.failure) {
    err << "up-calls: KESTA_ComputerSystem enumerations fail with "
        << cmpihost::rcName(*systems.failure) << "\n";
    return;
  }
  err << "up-calls: KESTA_ComputerSystem enumerations return "
      << (systems.names.empty() ? "no instance" : "Name=");
  const char* separator = "";
  for (const std::string& name : systems.names) {
    err << separator << '"' << name << '"';
    separator = ", ";
  }
  err << "\n";
}

int run(const CommandLine& line, const ToolIo& io) {
  // Everything that can be checked without the library is checked first.
  const Plan plan = planOperation(line);
  const std::optional<std::string> library = libraryToLoad(line, io);
  if (!library) return kExitNotLoaded;

  const ComputerSystemAnswer systems = computerSystems(line);
  ProviderSession session(*library, systems);
  if (line.verbose) {
    describeSetup(session, systems, io.err);
    std::ostream& err = io.err;
    session.watch([&err](const cmpihost::TraceRecord& trace) { err << traceLine(trace) << "\n"; },
                  [&err](const cmpihost::LogRecord& log) { err << logLine(log) << "\n"; });
  }
  prepare(plan, session);

  const Report report = execute(plan, session, line.verbose ? &io.err : nullptr);
  writeResults(report, line.json, io.out);
  writeStatus(report, line.verbose, io.err);
  if (const auto remark = instrumentationRemark(std::getenv("KESTA_INSTRUMENTATION"))) {
    io.err << "note: " << *remark << "\n";
  }
  return report.status.ok() ? kExitOk : kExitFailed;
}

// The sources, read here as the provider reads them, then the lights as the provider publishes
// them: an EnumerateInstances of KESTA_BlueLight with the properties that say what each light is.
int discover(const CommandLine& line, const ToolIo& io) {
  const DiscoveredSources sources = discoverSources();
  if (!line.json) io.out << sourcesText(sources) << "\n";

  CommandLine enumerate = line;
  enumerate.action = CommandLine::Action::Run;
  enumerate.operation = Operation::EnumerateInstances;
  enumerate.argument = "KESTA_BlueLight";
  enumerate.properties = discoveredProperties();
  const Plan plan = planOperation(enumerate);
  const std::optional<std::string> library = libraryToLoad(line, io);
  if (!library) return kExitNotLoaded;
  ProviderSession session(*library, computerSystems(enumerate));
  if (line.verbose) describeSetup(session, computerSystems(enumerate), io.err);
  prepare(plan, session);
  const Report report = execute(plan, session, line.verbose ? &io.err : nullptr);

  if (line.json) {
    Json json = jsonSources(sources);
    Json lights = Json::array();
    for (const cmpihost::InstanceValue& light : report.instances)
      lights.push_back(jsonInstance(light));
    json["lights"] = lights;
    json["status"] = jsonStatus(report.status);
    io.out << json.dump(2) << "\n";
  } else {
    io.out << lightsText(report.instances);
  }
  writeStatus(report, line.verbose, io.err);
  return report.status.ok() ? kExitOk : kExitFailed;
}

}  // namespace

int runTool(const std::vector<std::string>& arguments, const ToolIo& io) {
  try {
    const CommandLine line = parseCommandLine(arguments);
    switch (line.action) {
      case CommandLine::Action::Help:
        io.out << helpText();
        return kExitOk;
      case CommandLine::Action::Version:
        io.out << versionText();
        return kExitOk;
      case CommandLine::Action::Run:
        return run(line, io);
      case CommandLine::Action::Discover:
        return discover(line, io);
    }
  } catch (const UsageError& error) {
    sayError(io.err, error.what());
    io.err << "Try '" << kProgramName << " --help' for more information.\n";
    return kExitUsage;
  } catch (const NoProviderError& error) {
    sayError(io.err, error.what());
    return kExitFailed;
  } catch (const LoadFailure& error) {
    sayError(io.err, error.what());
    return kExitNotLoaded;
  } catch (const std::exception& error) {
    sayError(io.err, std::string("unexpected failure: ") + error.what());
    return kExitFailed;
  }
  return kExitFailed;
}

}  // namespace bluelight::cli
