// Dispatch as an object manager does it: which providers an operation goes to, with which
// arguments, and running it on them.
//
//  - Instance operations go to the instance MI of the provider registered for the class.
//  - Association operations go to association MIs. With an association class named
//    (--assoc-class for Associators/AssociatorNames, the ResultClass for References/
//    ReferenceNames) only its provider is asked; with none, every association provider is asked
//    in turn with a NULL association class and the results are merged.
#pragma once

#include <cmpihost/request.h>
#include <cmpihost/value.h>

#include <ostream>
#include <string>
#include <vector>

#include "CommandLine.h"
#include "Operation.h"
#include "ProviderMap.h"
#include "Report.h"

namespace bluelight::cli {

class ProviderSession;

struct Plan {
  struct Call {
    const ProviderInfo* provider;
    MIKind kind;
  };

  Operation operation = Operation::EnumerateInstances;
  /// The class path (enumerations) or object path, class names in their declared spelling.
  cmpihost::ObjectPathValue target;
  std::vector<Call> calls;
  /// True when several association providers are asked because no association class was named.
  bool severalAsked = false;

  cmpihost::OptionalText assocClass;
  cmpihost::OptionalText resultClass;
  cmpihost::OptionalText role;
  cmpihost::OptionalText resultRole;
  cmpihost::PropertyList properties;
};

/// Reads the argument and decides who is asked. Throws UsageError for an argument that cannot
/// be read, NoProviderError when no provider serves the class (or association class).
Plan planOperation(const CommandLine& line);

/// `path` with the class names the library knows (its own and nested ones) in their declared
/// spelling.
cmpihost::ObjectPathValue withCanonicalClassNames(const cmpihost::ObjectPathValue& path);

/// Creates every MI the plan needs, so that nothing runs when one cannot be created. Throws
/// LoadFailure.
void prepare(const Plan& plan, ProviderSession& session);

/// One line saying what is called, e.g.
/// "BlueLightProfileProvider.getInstance(root/cimv2:KESTA_BlueLight.DeviceID=\"x\",
/// properties=NULL)".
std::string describeCall(const Plan& plan, const Plan::Call& call);

/// Runs the plan's calls in order and merges their outcomes. With `verboseLog`, each call is
/// described there just before it is made.
Report execute(const Plan& plan, ProviderSession& session, std::ostream* verboseLog);

}  // namespace bluelight::cli
