// Fault injection: make the broker's creating functions fail on purpose, and make objects lose
// their handle after they were made.
//
// Providers must survive a broker that cannot create an object. A test arms a Fault on one of the
// creating functions; the k-th call of that function (counted from arming) then fails in the way
// the fault says. To cover every call site, run the operation once without faults, read
// Broker::creationCounts(), and arm k = 1 ... count in turn.
//
// Providers must also survive an object that was fine when it was made and checked, and whose
// handle is null when they come back to it (real brokers can hand such objects around). A fault
// of kind InvalidateHandle names a function of an object table instead (an ObjectFunction, e.g.
// CMPIObjectPathFT.setNameSpace): the k-th call of that function after arming does its work as
// usual and then sets the handle of the object it was called on to null. The host keeps owning
// the object, so it is still freed with its request; every later call on it fails with
// CMPI_RC_ERR_INVALID_HANDLE, and a result it is handed to records it as ObjectState::NullHandle.
// To find k, run the operation once without faults and count the calls of that function in
// Broker::calls() (or Outcome::calls).
//
//   // The light path whose namespace the provider sets second loses its handle right after:
//   broker.armFault(cmpihost::Fault::invalidateHandle(
//       cmpihost::ObjectFunction::pathSetNameSpace(), 2));
#pragma once

#include <cmpihost/status.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <ostream>
#include <string>
#include <vector>

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

/// A function of one of the nine tables of the encapsulated types, named as the recorder names
/// it (CallRecord::table and CallRecord::function), e.g. {"CMPIObjectPathFT", "addKey"}.
struct ObjectFunction {
  std::string table;     ///< "CMPIStringFT", "CMPIArrayFT", "CMPIObjectPathFT", "CMPIInstanceFT",
                         ///< "CMPIEnumerationFT", "CMPIResultFT", "CMPIContextFT",
                         ///< "CMPIArgsFT" or "CMPIDateTimeFT"
  std::string function;  ///< a slot of that table, e.g. "setNameSpace"

  ObjectFunction() = default;
  ObjectFunction(std::string table, std::string function);

  /// The three setters of CMPIObjectPathFT that providers call on every path they make.
  static ObjectFunction pathSetNameSpace();
  static ObjectFunction pathSetHostname();
  static ObjectFunction pathAddKey();

  /// True when the table exists and has a slot of that name other than "release" (an object
  /// that is freed cannot lose its handle afterwards). Slot names are compared exactly.
  bool valid() const;
  /// "CMPIObjectPathFT.setNameSpace".
  std::string toString() const;
};

bool operator==(const ObjectFunction& a, const ObjectFunction& b);
bool operator!=(const ObjectFunction& a, const ObjectFunction& b);
std::ostream& operator<<(std::ostream& out, const ObjectFunction& function);

/// Every function an InvalidateHandle fault can name (every slot of the nine tables except
/// release), table by table in the order of the CMPI headers.
const std::vector<ObjectFunction>& allObjectFunctions();

/// How a faulted call fails.
enum class FaultKind {
  /// Returns a null pointer and leaves *rc untouched (a broker that fails without saying why).
  NullResult,
  /// Returns an object whose handle is null (its function table is valid, so every call on it
  /// fails with CMPI_RC_ERR_INVALID_HANDLE); *rc is left untouched.
  NullHandle,
  /// Returns a null pointer and sets *rc (when rc is not null) to the fault's status.
  ErrorStatus,
  /// Not a creating-function fault: the call of the fault's objectFunction does its work and
  /// returns what it returns; then the handle of the object it was called on becomes null.
  /// Only calls on objects of this host that still have a handle are counted. `function` and
  /// `status` are not used.
  InvalidateHandle
};

const char* toString(FaultKind kind);
std::ostream& operator<<(std::ostream& out, FaultKind kind);

/// One armed failure.
struct Fault {
  /// The creating function that fails (NullResult, NullHandle, ErrorStatus).
  CreatingFunction function = CreatingFunction::NewInstance;
  /// Which call fails: 1 is the first call of `function` (or `objectFunction`) after arming.
  std::uint64_t nth = 1;
  FaultKind kind = FaultKind::NullResult;
  /// The status an ErrorStatus fault reports.
  StatusValue status{CMPI_RC_ERR_FAILED};
  /// When true the fault fires on the nth call and on every later one, until disarmed.
  bool sticky = false;
  /// The object function whose call invalidates its object (InvalidateHandle only).
  ObjectFunction objectFunction;

  static Fault nullResult(CreatingFunction function, std::uint64_t nth = 1);
  static Fault nullHandle(CreatingFunction function, std::uint64_t nth = 1);
  static Fault errorStatus(CreatingFunction function, std::uint64_t nth = 1,
                           StatusValue status = StatusValue{CMPI_RC_ERR_FAILED});
  /// The nth call of `function` after arming sets the handle of its object to null once it has
  /// done its work. Broker::armFault throws std::invalid_argument when `function` is not
  /// valid().
  static Fault invalidateHandle(ObjectFunction function, std::uint64_t nth = 1);
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
