#include <cmpihost/broker.h>
#include <cmpihost/request.h>

#include <cstdio>
#include <cstdlib>

#include "broker_core.h"
#include "objects.h"
#include "request_state.h"

namespace cmpihost {

namespace detail {

RequestState::RequestState(BrokerCore& core, RequestOptions options)
    : core_(core), id_(core.nextRequestId()), options_(std::move(options)) {
  core_.requestStarted();
  scope_ = std::make_unique<ObjectScope>(core_, this);
  // The context and result are the object manager's, not the provider's: a provider's CMRelease
  // must not free them while the host still uses them, so they are pinned.
  context_ = scope_->make<ContextObject>();
  context_->pin();
  context_->entries().set(CMPIInitNameSpace, Value::string(options_.nameSpace));
  context_->entries().set(CMPIInvocationFlags, Value::uint32(options_.invocationFlags));
  if (options_.principal)
    context_->entries().set(CMPIPrincipal, Value::string(*options_.principal));
  result_ = scope_->make<ResultObject>(this);
  result_->pin();
}

RequestState::~RequestState() {
  deactivate();
  scope_.reset();
  core_.requestEnded();
}

void RequestState::activate() {
  if (active_) return;
  pushCurrentScope(scope_.get());
  active_ = true;
  thread_ = std::this_thread::get_id();
}

void RequestState::deactivate() {
  if (!active_) return;
  active_ = false;
  if (thread_ != std::this_thread::get_id()) {
    // The making thread would keep a dangling current request and hand its next objects to it;
    // stopping here is kinder than the corruption that would follow.
    std::fprintf(stderr, "cmpihost: a Request must end on the thread that made it\n");
    std::abort();
  }
  removeCurrentScope(scope_.get());
}

const char* RequestState::keepText(std::string text) {
  std::lock_guard<std::mutex> lock(mutex_);
  texts_.push_back(std::move(text));
  return texts_.back().c_str();
}

const char** RequestState::keepList(std::vector<std::string> names) {
  std::lock_guard<std::mutex> lock(mutex_);
  listNames_.push_back(std::move(names));
  std::vector<const char*> pointers;
  pointers.reserve(listNames_.back().size() + 1);
  for (const std::string& name : listNames_.back()) pointers.push_back(name.c_str());
  pointers.push_back(nullptr);
  lists_.push_back(std::move(pointers));
  return lists_.back().data();
}

void RequestState::addResult(ResultEvent event) {
  std::lock_guard<std::mutex> lock(mutex_);
  if (event.kind == ResultKind::Done) ++doneCount_;
  results_.push_back(std::move(event));
}

void RequestState::addCall(CallRecord record) {
  std::lock_guard<std::mutex> lock(mutex_);
  calls_.push_back(std::move(record));
}

void RequestState::addTrace(TraceRecord record) {
  std::lock_guard<std::mutex> lock(mutex_);
  traces_.push_back(std::move(record));
}

void RequestState::addLog(LogRecord record) {
  std::lock_guard<std::mutex> lock(mutex_);
  logs_.push_back(std::move(record));
}

std::vector<ResultEvent> RequestState::results() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return results_;
}

std::size_t RequestState::doneCount() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return doneCount_;
}

std::vector<CallRecord> RequestState::calls() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return calls_;
}

std::vector<TraceRecord> RequestState::traces() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return traces_;
}

std::vector<LogRecord> RequestState::logs() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return logs_;
}

}  // namespace detail

Request::Request(Broker& broker, RequestOptions options)
    : broker_(&broker),
      state_(std::make_unique<detail::RequestState>(broker.core(), std::move(options))) {
  state_->activate();
}

Request::~Request() { state_->deactivate(); }

std::uint64_t Request::id() const { return state_->id(); }
Broker& Request::broker() const { return *broker_; }
const RequestOptions& Request::options() const { return state_->options(); }
CMPIContext* Request::context() const { return state_->context().cmpi(); }
CMPIResult* Request::result() const { return state_->result().cmpi(); }

CMPIObjectPath* Request::objectPath(const ObjectPathValue& path) {
  return state_->scope().make<detail::ObjectPathObject>(path)->cmpi();
}

CMPIObjectPath* Request::classPath(const std::string& className) {
  return objectPath(ObjectPathValue(state_->options().nameSpace, className));
}

CMPIInstance* Request::instance(const InstanceValue& instance) {
  return state_->scope().make<detail::InstanceObject>(instance)->cmpi();
}

CMPIString* Request::string(const std::string& text) {
  return state_->scope().make<detail::StringObject>(text)->cmpi();
}

const char** Request::propertyList(const PropertyList& properties) {
  if (!properties) return nullptr;
  return state_->keepList(*properties);
}

const char* Request::text(const OptionalText& text) {
  if (!text) return nullptr;
  return state_->keepText(*text);
}

void Request::addContextEntry(const std::string& name, const Value& value) {
  state_->context().entries().set(name, value);
}

std::vector<ResultEvent> Request::results() const { return state_->results(); }
std::size_t Request::doneCount() const { return state_->doneCount(); }
std::vector<CallRecord> Request::calls() const { return state_->calls(); }
std::vector<TraceRecord> Request::traces() const { return state_->traces(); }
std::vector<LogRecord> Request::logs() const { return state_->logs(); }
std::size_t Request::liveObjectCount() const { return state_->scope().size(); }

ScopeGuard::ScopeGuard(Request& request) : activated_(&request.state().scope()) {
  detail::pushCurrentScope(activated_);
}

ScopeGuard::~ScopeGuard() { detail::removeCurrentScope(activated_); }

}  // namespace cmpihost
