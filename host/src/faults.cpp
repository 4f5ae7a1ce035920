#include <cmpihost/faults.h>

#include <stdexcept>
#include <utility>

#include "fault_injector.h"

namespace cmpihost {

namespace {

// The slots of the nine object tables, in the order of the CMPI 2.0 headers, without release.
struct TableSlots {
  const char* table;
  std::vector<const char*> slots;
};

const std::vector<TableSlots>& objectTableSlots() {
  static const std::vector<TableSlots> tables = {
      {"CMPIStringFT", {"clone", "getCharPtr"}},
      {"CMPIArrayFT", {"clone", "getSize", "getSimpleType", "getElementAt", "setElementAt"}},
      {"CMPIObjectPathFT",
       {"clone", "setNameSpace", "getNameSpace", "setHostname", "getHostname", "setClassName",
        "getClassName", "addKey", "getKey", "getKeyAt", "getKeyCount", "setNameSpaceFromObjectPath",
        "setHostAndNameSpaceFromObjectPath", "getClassQualifier", "getPropertyQualifier",
        "getMethodQualifier", "getParameterQualifier", "toString"}},
      {"CMPIInstanceFT",
       {"clone", "getProperty", "getPropertyAt", "getPropertyCount", "setProperty", "getObjectPath",
        "setPropertyFilter", "setObjectPath", "setPropertyWithOrigin"}},
      {"CMPIEnumerationFT", {"clone", "getNext", "hasNext", "toArray"}},
      {"CMPIResultFT",
       {"clone", "returnData", "returnInstance", "returnObjectPath", "returnDone", "returnError"}},
      {"CMPIContextFT", {"clone", "getEntry", "getEntryAt", "getEntryCount", "addEntry"}},
      {"CMPIArgsFT", {"clone", "addArg", "getArg", "getArgAt", "getArgCount"}},
      {"CMPIDateTimeFT", {"clone", "getBinaryFormat", "getStringFormat", "isInterval"}}};
  return tables;
}

}  // namespace

ObjectFunction::ObjectFunction(std::string table, std::string function)
    : table(std::move(table)), function(std::move(function)) {}

ObjectFunction ObjectFunction::pathSetNameSpace() {
  return ObjectFunction("CMPIObjectPathFT", "setNameSpace");
}

ObjectFunction ObjectFunction::pathSetHostname() {
  return ObjectFunction("CMPIObjectPathFT", "setHostname");
}

ObjectFunction ObjectFunction::pathAddKey() { return ObjectFunction("CMPIObjectPathFT", "addKey"); }

bool ObjectFunction::valid() const {
  for (const TableSlots& entry : objectTableSlots()) {
    if (table != entry.table) continue;
    for (const char* slot : entry.slots) {
      if (function == slot) return true;
    }
  }
  return false;
}

std::string ObjectFunction::toString() const { return table + "." + function; }

bool operator==(const ObjectFunction& a, const ObjectFunction& b) {
  return a.table == b.table && a.function == b.function;
}

bool operator!=(const ObjectFunction& a, const ObjectFunction& b) { return !(a == b); }

std::ostream& operator<<(std::ostream& out, const ObjectFunction& function) {
  return out << function.toString();
}

const std::vector<ObjectFunction>& allObjectFunctions() {
  static const std::vector<ObjectFunction> all = [] {
    std::vector<ObjectFunction> functions;
    for (const TableSlots& entry : objectTableSlots()) {
      for (const char* slot : entry.slots) functions.emplace_back(entry.table, slot);
    }
    return functions;
  }();
  return all;
}

const std::array<CreatingFunction, kCreatingFunctionCount>& allCreatingFunctions() {
  static const std::array<CreatingFunction, kCreatingFunctionCount> all = {
      CreatingFunction::NewInstance,
      CreatingFunction::NewObjectPath,
      CreatingFunction::NewArgs,
      CreatingFunction::NewString,
      CreatingFunction::NewArray,
      CreatingFunction::NewDateTime,
      CreatingFunction::NewDateTimeFromBinary,
      CreatingFunction::NewDateTimeFromChars,
      CreatingFunction::GetObjectPath,
      CreatingFunction::Clone,
      CreatingFunction::EnumerateInstanceNames,
      CreatingFunction::EnumerateInstances};
  return all;
}

const char* toString(CreatingFunction function) {
  switch (function) {
    case CreatingFunction::NewInstance:
      return "newInstance";
    case CreatingFunction::NewObjectPath:
      return "newObjectPath";
    case CreatingFunction::NewArgs:
      return "newArgs";
    case CreatingFunction::NewString:
      return "newString";
    case CreatingFunction::NewArray:
      return "newArray";
    case CreatingFunction::NewDateTime:
      return "newDateTime";
    case CreatingFunction::NewDateTimeFromBinary:
      return "newDateTimeFromBinary";
    case CreatingFunction::NewDateTimeFromChars:
      return "newDateTimeFromChars";
    case CreatingFunction::GetObjectPath:
      return "getObjectPath";
    case CreatingFunction::Clone:
      return "clone";
    case CreatingFunction::EnumerateInstanceNames:
      return "enumerateInstanceNames";
    case CreatingFunction::EnumerateInstances:
      return "enumerateInstances";
  }
  return "?";
}

std::ostream& operator<<(std::ostream& out, CreatingFunction function) {
  return out << toString(function);
}

const char* toString(FaultKind kind) {
  switch (kind) {
    case FaultKind::NullResult:
      return "NullResult";
    case FaultKind::NullHandle:
      return "NullHandle";
    case FaultKind::ErrorStatus:
      return "ErrorStatus";
    case FaultKind::InvalidateHandle:
      return "InvalidateHandle";
  }
  return "?";
}

std::ostream& operator<<(std::ostream& out, FaultKind kind) { return out << toString(kind); }

Fault Fault::nullResult(CreatingFunction function, std::uint64_t nth) {
  Fault fault;
  fault.function = function;
  fault.nth = nth;
  fault.kind = FaultKind::NullResult;
  return fault;
}

Fault Fault::nullHandle(CreatingFunction function, std::uint64_t nth) {
  Fault fault = nullResult(function, nth);
  fault.kind = FaultKind::NullHandle;
  return fault;
}

Fault Fault::errorStatus(CreatingFunction function, std::uint64_t nth, StatusValue status) {
  Fault fault = nullResult(function, nth);
  fault.kind = FaultKind::ErrorStatus;
  fault.status = std::move(status);
  return fault;
}

Fault Fault::invalidateHandle(ObjectFunction function, std::uint64_t nth) {
  Fault fault;
  fault.nth = nth;
  fault.kind = FaultKind::InvalidateHandle;
  fault.objectFunction = std::move(function);
  return fault;
}

Fault Fault::fromThenOn() const {
  Fault fault = *this;
  fault.sticky = true;
  return fault;
}

std::uint64_t CreationCounts::total() const {
  std::uint64_t sum = 0;
  for (const std::uint64_t count : counts_) sum += count;
  return sum;
}

namespace detail {

FaultInjector::FaultInjector() {
  for (auto& count : counts_) count.store(0, std::memory_order_relaxed);
}

FaultDecision FaultInjector::onCall(CreatingFunction function) {
  counts_[static_cast<std::size_t>(function)].fetch_add(1, std::memory_order_relaxed);
  FaultDecision decision;
  if (!anyArmed_.load(std::memory_order_acquire)) return decision;
  std::lock_guard<std::mutex> lock(mutex_);
  // Every armed fault of this function counts the call, also when an earlier one fires, so that
  // "the k-th call after arming" means the same thing for each of them.
  for (Armed& armed : faults_) {
    if (!armed.active || armed.fault.kind == FaultKind::InvalidateHandle ||
        armed.fault.function != function) {
      continue;
    }
    ++armed.seen;
    const bool due =
        armed.fault.sticky ? armed.seen >= armed.fault.nth : armed.seen == armed.fault.nth;
    if (!due) continue;
    if (!armed.fault.sticky) armed.active = false;
    ++armed.fired;
    if (!decision.fire) {
      decision.fire = true;
      decision.kind = armed.fault.kind;
      decision.status = armed.fault.status;
    }
  }
  updateArmedFlagLocked();
  return decision;
}

bool FaultInjector::onObjectCall(const char* table, const char* function) {
  if (!anyInvalidateArmed_.load(std::memory_order_acquire)) return false;
  if (table == nullptr || function == nullptr) return false;
  std::lock_guard<std::mutex> lock(mutex_);
  // As for the creating functions: every due fault is spent, also when an earlier one fired.
  bool invalidate = false;
  for (Armed& armed : faults_) {
    if (!armed.active || armed.fault.kind != FaultKind::InvalidateHandle) continue;
    if (armed.fault.objectFunction.table != table ||
        armed.fault.objectFunction.function != function) {
      continue;
    }
    ++armed.seen;
    const bool due =
        armed.fault.sticky ? armed.seen >= armed.fault.nth : armed.seen == armed.fault.nth;
    if (!due) continue;
    if (!armed.fault.sticky) armed.active = false;
    ++armed.fired;
    invalidate = true;
  }
  updateArmedFlagLocked();
  return invalidate;
}

FaultId FaultInjector::arm(const Fault& fault) {
  if (fault.kind == FaultKind::InvalidateHandle && !fault.objectFunction.valid()) {
    throw std::invalid_argument("cmpihost: no object function " + fault.objectFunction.toString() +
                                " can lose its object's handle");
  }
  std::lock_guard<std::mutex> lock(mutex_);
  Armed armed;
  armed.id = nextId_++;
  armed.fault = fault;
  // A fault for "the 0th call" would never fire; treat it as the first.
  if (armed.fault.nth == 0) armed.fault.nth = 1;
  faults_.push_back(armed);
  updateArmedFlagLocked();
  return armed.id;
}

bool FaultInjector::disarm(FaultId id) {
  std::lock_guard<std::mutex> lock(mutex_);
  for (Armed& armed : faults_) {
    if (armed.id == id) {
      armed.active = false;
      updateArmedFlagLocked();
      return true;
    }
  }
  return false;
}

void FaultInjector::clear() {
  std::lock_guard<std::mutex> lock(mutex_);
  faults_.clear();
  updateArmedFlagLocked();
}

std::uint64_t FaultInjector::fireCount(FaultId id) const {
  std::lock_guard<std::mutex> lock(mutex_);
  for (const Armed& armed : faults_) {
    if (armed.id == id) return armed.fired;
  }
  return 0;
}

CreationCounts FaultInjector::counts() const {
  CreationCounts result;
  for (const CreatingFunction function : allCreatingFunctions()) {
    result[function] = counts_[static_cast<std::size_t>(function)].load(std::memory_order_relaxed);
  }
  return result;
}

void FaultInjector::resetCounts() {
  for (auto& count : counts_) count.store(0, std::memory_order_relaxed);
}

void FaultInjector::updateArmedFlagLocked() {
  bool anyCreating = false;
  bool anyInvalidate = false;
  for (const Armed& armed : faults_) {
    if (!armed.active) continue;
    if (armed.fault.kind == FaultKind::InvalidateHandle) {
      anyInvalidate = true;
    } else {
      anyCreating = true;
    }
  }
  anyArmed_.store(anyCreating, std::memory_order_release);
  anyInvalidateArmed_.store(anyInvalidate, std::memory_order_release);
}

}  // namespace detail
}  // namespace cmpihost
