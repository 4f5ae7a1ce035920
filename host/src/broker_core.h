// The implementation behind cmpihost::Broker: the CMPIBroker with its tables, configuration,
// records and faults.
#pragma once

#include <cmpift.h>
#include <cmpihost/broker.h>
#include <cmpihost/records.h>
#include <cmpihost/status.h>
#include <cmpihost/value.h>

#include <atomic>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_set>
#include <vector>

#include "fault_injector.h"
#include "object_scope.h"

namespace cmpihost::detail {

class RequestState;

// The broker's four tables, filled by the source file of each (the data fields of the up-call
// table, and the ftVersion of the others, come from the broker's options).
CMPIBrokerFT makeUpcallTable(const BrokerOptions& options);
CMPIBrokerEncFT makeFactoryTable(int version);
CMPIBrokerExtFT makeOsServiceTable(int version);
CMPIBrokerMemFT makeMemoryTable(int version);
/// True when `table` is a factory table made by makeFactoryTable (judged by its functions).
bool isFactoryTableOfThisHost(const CMPIBrokerEncFT* table);

/// How an enumeration up-call of one class is answered.
struct UpcallAnswer {
  bool fail = false;
  StatusValue status;                    // when fail
  std::vector<InstanceValue> instances;  // when not fail
};

class BrokerCore {
 public:
  explicit BrokerCore(BrokerOptions options);
  ~BrokerCore();
  BrokerCore(const BrokerCore&) = delete;
  BrokerCore& operator=(const BrokerCore&) = delete;

  /// The core behind a CMPIBroker of this host, or null (null pointer, null handle, or not ours).
  static BrokerCore* from(const CMPIBroker* broker);
  /// The core of the scope current on this thread, or null; used to record calls on objects
  /// that cannot name their broker (a null object pointer).
  static BrokerCore* currentOnThread();

  const CMPIBroker* cmpi() const { return &broker_; }
  const BrokerOptions& options() const { return options_; }

  // ---- Scopes and requests ----

  ObjectScope& rootScope() { return *root_; }
  /// Where new objects go: the current request's scope on this thread when that request belongs
  /// to this broker, else the broker's own scope.
  ObjectScope& targetScope();
  /// The request current on this thread, when it belongs to this broker.
  RequestState* currentRequest();
  std::uint64_t nextRequestId() { return ++lastRequestId_; }
  void requestStarted() { liveRequests_.fetch_add(1); }
  void requestEnded() { liveRequests_.fetch_sub(1); }

  void objectCreated() { liveObjects_.fetch_add(1, std::memory_order_relaxed); }
  void objectDestroyed() { liveObjects_.fetch_sub(1, std::memory_order_relaxed); }
  std::size_t liveObjects() const { return liveObjects_.load(std::memory_order_relaxed); }

  // GC marks handed out by CMPIBrokerMemFT.mark, so that release() can check its argument.
  void rememberMark(const void* mark);
  void forgetMark(const void* mark);
  bool isMark(const void* mark) const;

  // ---- Configuration ----

  void setClassKeys(std::string className, std::vector<std::string> keys);
  std::optional<std::vector<std::string>> classKeys(std::string_view className) const;
  void setSuperclass(const std::string& className, const std::string& superclass);
  bool classIsA(std::string_view className, std::string_view type) const;

  void setUpcallAnswer(const std::string& className, UpcallAnswer answer);
  void clearUpcall(std::string_view className);
  void clearUpcalls();
  /// The configured answer; an empty, successful one for classes with nothing configured.
  UpcallAnswer upcallAnswer(std::string_view className) const;

  // ---- Recording ----

  bool recording() const { return recording_.load(std::memory_order_relaxed); }
  void setRecording(bool on) { recording_.store(on, std::memory_order_relaxed); }

  /// Records a call when recording is on; `makeArgs` renders the arguments only then.
  template <class MakeArgs>
  void recordCall(const char* table, const char* function, MakeArgs&& makeArgs) {
    if (!recording()) return;
    CallRecord record;
    record.table = table;
    record.function = function;
    record.args = makeArgs();
    addCall(std::move(record));
  }
  void addCall(CallRecord record);
  /// Always calls the callback; stores only while recording.
  void addTrace(TraceRecord record);
  void addLog(LogRecord record);
  /// Stores in the request always (it is the operation's output) and broker-wide while recording.
  void addResult(RequestState* request, ResultEvent event);

  std::vector<CallRecord> calls() const;
  std::vector<TraceRecord> traces() const;
  std::vector<LogRecord> logs() const;
  std::vector<ResultEvent> results() const;
  void clearRecords();
  void setTraceCallback(TraceCallback callback);
  void setLogCallback(LogCallback callback);

  // ---- Faults ----

  FaultInjector& faults() { return faults_; }

  // ---- Statuses ----

  /// A status whose message (when rc is not OK) is a new string in the target scope.
  CMPIStatus makeStatus(CMPIrc rc, const std::string& message);
  /// A status made from a StatusValue the same way.
  CMPIStatus makeStatus(const StatusValue& value);

 private:
  BrokerOptions options_;
  CMPIBrokerFT upcallTable_;
  CMPIBrokerEncFT factoryTable_;
  CMPIBrokerExtFT osServiceTable_;
  CMPIBrokerMemFT memoryTable_;
  CMPIBroker broker_;

  std::atomic<std::uint64_t> lastRequestId_{0};
  std::atomic<std::size_t> liveRequests_{0};
  std::atomic<std::size_t> liveObjects_{0};
  std::atomic<bool> recording_;

  mutable std::mutex marksMutex_;
  std::unordered_set<const void*> marks_;

  mutable std::mutex configMutex_;
  std::map<std::string, std::pair<std::string, std::vector<std::string>>>
      classKeys_;                                    // by lower-case name
  std::map<std::string, std::string> superclasses_;  // lower-case -> lower-case
  std::map<std::string, UpcallAnswer> upcalls_;      // by lower-case name

  mutable std::mutex recordsMutex_;
  std::vector<CallRecord> calls_;
  std::vector<TraceRecord> traces_;
  std::vector<LogRecord> logs_;
  std::vector<ResultEvent> results_;
  std::shared_ptr<const TraceCallback> traceCallback_;
  std::shared_ptr<const LogCallback> logCallback_;

  FaultInjector faults_;

  // Declared last so that it is destroyed first: the objects it frees use the members above.
  std::unique_ptr<ObjectScope> root_;
};

}  // namespace cmpihost::detail
