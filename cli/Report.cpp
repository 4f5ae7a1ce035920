#include "Report.h"

#include <cstddef>
#include <utility>

namespace bluelight::cli {

using cmpihost::ObjectState;
using cmpihost::ResultEvent;
using cmpihost::ResultKind;

const char* toString(MIKind kind) { return kind == MIKind::Instance ? "instance" : "association"; }

namespace {

// "1 instance", "2 instances".
std::string count(std::size_t n, const std::string& singular, const std::string& plural) {
  return std::to_string(n) + " " + (n == 1 ? singular : plural);
}

// What one run handed to its result, sorted by what the operation can show.
struct Tally {
  std::size_t instances = 0;
  std::size_t paths = 0;
  std::size_t unreadable = 0;
  std::size_t data = 0;
  std::size_t errors = 0;
};

Tally tallyOf(const std::vector<ResultEvent>& events) {
  Tally tally;
  for (const ResultEvent& event : events) {
    switch (event.kind) {
      case ResultKind::Instance:
      case ResultKind::ObjectPath:
        if (event.state != ObjectState::Valid) {
          ++tally.unreadable;
        } else if (event.kind == ResultKind::Instance) {
          ++tally.instances;
        } else {
          ++tally.paths;
        }
        break;
      case ResultKind::Data:
        ++tally.data;
        break;
      case ResultKind::Error:
        ++tally.errors;
        break;
      case ResultKind::Done:
        break;
    }
  }
  return tally;
}

void noteRun(const ProviderRun& run, const Tally& tally, bool wantInstances, Report& report) {
  const std::string& name = run.provider;
  if (tally.unreadable > 0) {
    report.notes.push_back(name + " handed over " +
                           count(tally.unreadable, "object that cannot", "objects that cannot") +
                           " be read (a null pointer or a null handle); not shown");
  }
  if (wantInstances && tally.paths > 0) {
    report.notes.push_back(name + " handed over " +
                           count(tally.paths, "object path", "object paths") +
                           " where instances were expected; not shown");
  }
  if (!wantInstances && tally.instances > 0) {
    report.notes.push_back(name + " handed over " +
                           count(tally.instances, "instance", "instances") +
                           " where object paths were expected; not shown");
  }
  if (tally.data > 0) {
    report.notes.push_back(name + " handed over " + count(tally.data, "value", "values") +
                           " with returnData; not shown");
  }
  if (tally.errors > 0) {
    report.verboseNotes.push_back(name + " called returnError " +
                                  count(tally.errors, "time", "times"));
  }
  if (run.outcome.doneCount == 0) {
    report.verboseNotes.push_back(name + " did not signal the end of the result (no CMReturnDone)");
  } else if (run.outcome.doneCount > 1) {
    report.verboseNotes.push_back(name + " signalled the end of the result " +
                                  count(run.outcome.doneCount, "time", "times"));
  }
}

}  // namespace

Report buildReport(Operation operation, cmpihost::ObjectPathValue target,
                   std::vector<ProviderRun> runs, bool severalAsked) {
  Report report;
  report.operation = operation;
  report.target = std::move(target);
  report.runs = std::move(runs);
  const OperationInfo& info = infoOf(operation);

  std::size_t shown = 0;
  for (const ProviderRun& run : report.runs) {
    const Tally tally = tallyOf(run.outcome.results);
    noteRun(run, tally, info.returnsInstances, report);
    shown += info.returnsInstances ? tally.instances : tally.paths;
    if (report.status.ok() && !run.outcome.status.ok()) {
      report.status = run.outcome.status;
      report.statusProvider = run.provider;
    }
  }

  if (!report.status.ok()) {
    if (shown > 0) {
      std::string note = count(shown, "result", "results") + " handed over by " +
                         (report.runs.size() > 1 ? "the providers" : "the provider") +
                         (shown == 1 ? " is" : " are") +
                         " not shown: a client of an object manager only gets the error";
      if (severalAsked)
        note += "; name one association class with --assoc-class to ask only its provider";
      report.notes.push_back(note);
    }
    if (report.runs.size() > 1) {
      report.verboseNotes.push_back("the status is the one " + report.statusProvider + " returned");
    }
    return report;
  }

  for (const ProviderRun& run : report.runs) {
    if (info.returnsInstances) {
      for (cmpihost::InstanceValue& instance : run.outcome.instances()) {
        report.instances.push_back(std::move(instance));
      }
    } else {
      for (cmpihost::ObjectPathValue& path : run.outcome.paths()) {
        report.paths.push_back(std::move(path));
      }
    }
  }
  if (operation == Operation::GetInstance && report.instances.empty()) {
    report.notes.emplace_back(
        "the provider returned neither an instance nor an error for this path; an object "
        "manager would answer its client with CIM_ERR_NOT_FOUND");
  } else if (operation == Operation::GetInstance && report.instances.size() > 1) {
    report.notes.push_back("the provider returned " +
                           count(report.instances.size(), "instance", "instances") +
                           " for one path");
  }
  return report;
}

}  // namespace bluelight::cli
