// What one run of the tool found out: the outcome of every provider asked, merged into the one
// answer a client of an object manager would get, plus the remarks worth telling the user.
#pragma once

#include <cmpihost/driver.h>
#include <cmpihost/status.h>
#include <cmpihost/value.h>

#include <string>
#include <vector>

#include "Operation.h"

namespace bluelight::cli {

/// Which MI of a provider was called.
enum class MIKind { Instance, Association };

const char* toString(MIKind kind);

/// One provider call and everything it produced.
struct ProviderRun {
  std::string provider;
  MIKind kind = MIKind::Instance;
  cmpihost::Outcome outcome;
};

struct Report {
  Operation operation = Operation::EnumerateInstances;
  /// The class path (enumerations) or object path the operation was sent for.
  cmpihost::ObjectPathValue target;
  std::vector<ProviderRun> runs;

  /// The merged status: the first error in asking order, else CMPI_RC_OK.
  cmpihost::StatusValue status;
  /// The provider whose error `status` is; empty when it is OK.
  std::string statusProvider;

  /// What a client would be shown: the results of every provider, in asking order, when the
  /// status is OK; nothing when it is an error (an object manager answers with the error only).
  std::vector<cmpihost::InstanceValue> instances;
  std::vector<cmpihost::ObjectPathValue> paths;

  /// Remarks for every run of the tool (unexpected or easily misread provider behaviour).
  std::vector<std::string> notes;
  /// Remarks only shown with --verbose (details of how the providers ended their results).
  std::vector<std::string> verboseNotes;
};

/// Merges the runs. `severalAsked` says that the providers were asked because no association
/// class was named, which the notes then point out.
Report buildReport(Operation operation, cmpihost::ObjectPathValue target,
                   std::vector<ProviderRun> runs, bool severalAsked);

}  // namespace bluelight::cli
