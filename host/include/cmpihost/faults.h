// Fault injection: make the broker's creating functions fail on purpose.
//
// Providers must survive a broker that cannot create an object. A test arms a Fault on one of the
// creating functions; the k-th call of that function (counted from arming) then fails in the way
// the fault says. To cover every call site, run the operation once without faults, read
// Broker::creationCounts(), and arm k = 1 ... count in turn.
#pragma once

#include <cmpihost/status.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <ostream>

namespace cmpihost {

/// The broker functions that create an object, and so can be made to fail.
enum class CreatingFunction {
  NewInstance,             ///< CMPIBrokerEncFT.newInstance
  NewObjectPath,           ///< CMPIBrokerEncFT.newObjectPath
  NewArgs,                 ///< CMPIBrokerEncFT.newArgs
  NewString,               ///< CMPIBrokerEncFT.newString
  NewArray,                ///< CMPIBrokerEncFT.newArray
  NewDateTime,             ///< CMPIBrokerEncFT.newDateTime
  NewDateTimeFromBinary,   ///< CMPIBrokerEncFT.newDateTimeFromBinary
  NewDateTimeFromChars,    ///< CMPIBrokerEncFT.newDateTimeFromChars
  GetObjectPath,           ///< CMPIInstanceFT.getObjectPath
  Clone,                   ///< the clone function of any object type
  EnumerateInstanceNames,  ///< CMPIBrokerFT.enumerateInstanceNames (up-call)
  EnumerateInstances       ///< CMPIBrokerFT.enumerateInstances (up-call)
};

inline constexpr std::size_t kCreatingFunctionCount = 12;

/// Every creating function, in declaration order.
const std::array<CreatingFunction, kCreatingFunctionCount>& allCreatingFunctions();

/// The slot name, e.g. "newObjectPath", "getObjectPath", "clone".
const char* toString(CreatingFunction function);
std::ostream& operator<<(std::ostream& out, CreatingFunction function);

/// How a faulted call fails.
enum class FaultKind {
  /// Returns a null pointer and leaves *rc untouched (a broker that fails without saying why).
  NullResult,
  /// Returns an object whose handle is null (its function table is valid, so every call on it
  /// fails with CMPI_RC_ERR_INVALID_HANDLE); *rc is left untouched.
  NullHandle,
  /// Returns a null pointer and sets *rc (when rc is not null) to the fault's status.
  ErrorStatus
};

const char* toString(FaultKind kind);
std::ostream& operator<<(std::ostream& out, FaultKind kind);

/// One armed failure.
struct Fault {
  CreatingFunction function = CreatingFunction::NewInstance;
  /// Which call fails: 1 is the first call of `function` after arming.
  std::uint64_t nth = 1;
  FaultKind kind = FaultKind::NullResult;
  /// The status an ErrorStatus fault reports.
  StatusValue status{CMPI_RC_ERR_FAILED};
  /// When true the fault fires on the nth call and on every later one, until disarmed.
  bool sticky = false;

  static Fault nullResult(CreatingFunction function, std::uint64_t nth = 1);
  static Fault nullHandle(CreatingFunction function, std::uint64_t nth = 1);
  static Fault errorStatus(CreatingFunction function, std::uint64_t nth = 1,
                           StatusValue status = StatusValue{CMPI_RC_ERR_FAILED});
  /// The same fault, firing from its nth call on.
  Fault fromThenOn() const;
};

/// Identifies an armed fault (never 0).
using FaultId = std::uint64_t;

/// How many calls of each creating function the broker has seen (faulted calls included).
class CreationCounts {
 public:
  std::uint64_t operator[](CreatingFunction function) const {
    return counts_[static_cast<std::size_t>(function)];
  }
  std::uint64_t& operator[](CreatingFunction function) {
    return counts_[static_cast<std::size_t>(function)];
  }
  std::uint64_t total() const;

 private:
  std::array<std::uint64_t, kCreatingFunctionCount> counts_{};
};

}  // namespace cmpihost
