// Counts the calls of the creating functions and decides which of them fail, and which calls of
// object functions leave their object without a handle.
#pragma once

#include <cmpihost/faults.h>

#include <array>
#include <atomic>
#include <cstdint>
#include <mutex>
#include <vector>

namespace cmpihost::detail {

/// What a creating function must do on this call.
struct FaultDecision {
  bool fire = false;
  FaultKind kind = FaultKind::NullResult;
  StatusValue status;
};

class FaultInjector {
 public:
  FaultInjector();

  /// Counts one call of `function` and says whether it fails. Cheap when nothing is armed: the
  /// count is an atomic increment and the armed faults are only looked at under the lock when
  /// there are any.
  FaultDecision onCall(CreatingFunction function);

  /// Counts one call of an object function on an object that has a handle, for the armed
  /// InvalidateHandle faults of that function, and says whether the object must lose its handle
  /// once the call has done its work. Cheap when no such fault is armed.
  bool onObjectCall(const char* table, const char* function);

  /// Throws std::invalid_argument for an InvalidateHandle fault with an invalid object function.
  FaultId arm(const Fault& fault);
  bool disarm(FaultId id);
  void clear();
  std::uint64_t fireCount(FaultId id) const;

  CreationCounts counts() const;
  void resetCounts();

 private:
  struct Armed {
    FaultId id = 0;
    Fault fault;
    std::uint64_t seen = 0;  // calls of fault.function since arming
    std::uint64_t fired = 0;
    bool active = true;
  };

  void updateArmedFlagLocked();

  std::array<std::atomic<std::uint64_t>, kCreatingFunctionCount> counts_;
  std::atomic<bool> anyArmed_{false};            // a creating-function fault is armed
  std::atomic<bool> anyInvalidateArmed_{false};  // an InvalidateHandle fault is armed
  mutable std::mutex mutex_;
  std::vector<Armed> faults_;  // in arming order; spent faults stay for fireCount()
  FaultId nextId_ = 1;
};

}  // namespace cmpihost::detail
