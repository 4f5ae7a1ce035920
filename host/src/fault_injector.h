// Counts the calls of the creating functions and decides which of them fail.
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
  std::atomic<bool> anyArmed_{false};
  mutable std::mutex mutex_;
  std::vector<Armed> faults_;  // in arming order; spent faults stay for fireCount()
  FaultId nextId_ = 1;
};

}  // namespace cmpihost::detail
