#include <cmpihost/faults.h>

#include "fault_injector.h"

namespace cmpihost {

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
    if (!armed.active || armed.fault.function != function) continue;
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

FaultId FaultInjector::arm(const Fault& fault) {
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
  bool any = false;
  for (const Armed& armed : faults_) any = any || armed.active;
  anyArmed_.store(any, std::memory_order_release);
}

}  // namespace detail
}  // namespace cmpihost
