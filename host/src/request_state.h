// The state behind cmpihost::Request: its scope, its context and result, the inputs it keeps
// alive and what was handed to its result.
#pragma once

#include <cmpihost/records.h>
#include <cmpihost/request.h>

#include <cstddef>
#include <cstdint>
#include <deque>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "object_scope.h"

namespace cmpihost::detail {

class BrokerCore;
class ContextObject;
class ResultObject;

class RequestState {
 public:
  RequestState(BrokerCore& core, RequestOptions options);
  ~RequestState();
  RequestState(const RequestState&) = delete;
  RequestState& operator=(const RequestState&) = delete;

  std::uint64_t id() const { return id_; }
  BrokerCore& core() const { return core_; }
  ObjectScope& scope() { return *scope_; }
  const RequestOptions& options() const { return options_; }
  ContextObject& context() { return *context_; }
  ResultObject& result() { return *result_; }

  /// Makes the request current on this thread; deactivate() takes it off again (on the same
  /// thread; elsewhere it does nothing).
  void activate();
  void deactivate();

  // Inputs that must live as long as the request.
  const char* keepText(std::string text);
  const char** keepList(std::vector<std::string> names);

  // What happened (each may be called from any thread that has the request current).
  void addResult(ResultEvent event);
  void addCall(CallRecord record);
  void addTrace(TraceRecord record);
  void addLog(LogRecord record);

  std::vector<ResultEvent> results() const;
  std::size_t doneCount() const;
  std::vector<CallRecord> calls() const;
  std::vector<TraceRecord> traces() const;
  std::vector<LogRecord> logs() const;

 private:
  BrokerCore& core_;
  const std::uint64_t id_;
  const RequestOptions options_;

  mutable std::mutex mutex_;
  std::vector<ResultEvent> results_;
  std::size_t doneCount_ = 0;
  std::vector<CallRecord> calls_;
  std::vector<TraceRecord> traces_;
  std::vector<LogRecord> logs_;

  std::deque<std::string> texts_;
  std::deque<std::vector<std::string>> listNames_;
  std::deque<std::vector<const char*>> lists_;

  bool active_ = false;
  std::thread::id thread_;  // the thread the request is current on while active

  // Declared last so that it is destroyed first, while the records above still exist.
  std::unique_ptr<ObjectScope> scope_;
  ContextObject* context_ = nullptr;
  ResultObject* result_ = nullptr;
};

}  // namespace cmpihost::detail
