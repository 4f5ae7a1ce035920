#include "broker_core.h"

#include <cstdio>
#include <cstdlib>

#include "objects.h"
#include "request_state.h"
#include "text.h"

namespace cmpihost::detail {

namespace {

// The classes of the blue-light profile and the computer system they hang off; a test adds more
// with Broker::setClassKeys.
const std::vector<std::pair<std::string, std::vector<std::string>>>& defaultClassKeys() {
  static const std::vector<std::pair<std::string, std::vector<std::string>>> keys = {
      {"KESTA_BlueLight",
       {"CreationClassName", "DeviceID", "SystemCreationClassName", "SystemName"}},
      {"KESTA_BlueLightCapabilities", {"InstanceID"}},
      {"KESTA_BlueLightElementCapabilities", {"ManagedElement", "Capabilities"}},
      {"KESTA_BlueLightSystemDevice", {"GroupComponent", "PartComponent"}},
      {"KESTA_ComputerSystem", {"CreationClassName", "Name"}},
  };
  return keys;
}

}  // namespace

BrokerCore::BrokerCore(BrokerOptions options)
    : options_(std::move(options)),
      upcallTable_(makeUpcallTable(options_)),
      factoryTable_(makeFactoryTable(options_.version)),
      osServiceTable_(makeOsServiceTable(options_.version)),
      memoryTable_(makeMemoryTable(options_.version)),
      broker_{this, &upcallTable_, &factoryTable_, &osServiceTable_, &memoryTable_},
      recording_(options_.recording) {
  for (const auto& [className, keys] : defaultClassKeys()) setClassKeys(className, keys);
  root_ = std::make_unique<ObjectScope>(*this, nullptr);
}

BrokerCore::~BrokerCore() {
  if (liveRequests_.load() != 0) {
    // The requests' objects would outlive the broker that their functions use.
    std::fprintf(stderr, "cmpihost: Broker destroyed while %zu request(s) are still alive\n",
                 liveRequests_.load());
    std::abort();
  }
  root_.reset();
}

BrokerCore* BrokerCore::from(const CMPIBroker* broker) {
  // Our brokers are recognised by their factory table before their handle is trusted, so that a
  // foreign broker is refused instead of being read as one of ours.
  if (broker == nullptr || broker->hdl == nullptr || !isFactoryTableOfThisHost(broker->eft)) {
    return nullptr;
  }
  auto* core = static_cast<BrokerCore*>(broker->hdl);
  return core->cmpi() == broker ? core : nullptr;
}

BrokerCore* BrokerCore::currentOnThread() {
  ObjectScope* scope = currentScope();
  return scope != nullptr ? &scope->core() : nullptr;
}

ObjectScope& BrokerCore::targetScope() {
  ObjectScope* scope = currentScope();
  if (scope != nullptr && &scope->core() == this) return *scope;
  return *root_;
}

RequestState* BrokerCore::currentRequest() {
  ObjectScope* scope = currentScope();
  if (scope != nullptr && &scope->core() == this) return scope->request();
  return nullptr;
}

void BrokerCore::rememberMark(const void* mark) {
  std::lock_guard<std::mutex> lock(marksMutex_);
  marks_.insert(mark);
}

void BrokerCore::forgetMark(const void* mark) {
  std::lock_guard<std::mutex> lock(marksMutex_);
  marks_.erase(mark);
}

bool BrokerCore::isMark(const void* mark) const {
  std::lock_guard<std::mutex> lock(marksMutex_);
  return marks_.count(mark) != 0;
}

// ---- Configuration ----------------------------------------------------------------------------

void BrokerCore::setClassKeys(std::string className, std::vector<std::string> keys) {
  std::lock_guard<std::mutex> lock(configMutex_);
  std::string lower = asciiLowerCopy(className);
  classKeys_[std::move(lower)] = {std::move(className), std::move(keys)};
}

std::optional<std::vector<std::string>> BrokerCore::classKeys(std::string_view className) const {
  std::lock_guard<std::mutex> lock(configMutex_);
  const auto it = classKeys_.find(asciiLowerCopy(className));
  if (it == classKeys_.end()) return std::nullopt;
  return it->second.second;
}

void BrokerCore::setSuperclass(const std::string& className, const std::string& superclass) {
  std::lock_guard<std::mutex> lock(configMutex_);
  superclasses_[asciiLowerCopy(className)] = asciiLowerCopy(superclass);
}

bool BrokerCore::classIsA(std::string_view className, std::string_view type) const {
  std::lock_guard<std::mutex> lock(configMutex_);
  std::string current = asciiLowerCopy(className);
  const std::string wanted = asciiLowerCopy(type);
  // The chain is bounded by the number of declared superclasses, so a cycle cannot loop forever.
  for (std::size_t steps = 0; steps <= superclasses_.size(); ++steps) {
    if (current == wanted) return true;
    const auto it = superclasses_.find(current);
    if (it == superclasses_.end()) return false;
    current = it->second;
  }
  return false;
}

void BrokerCore::setUpcallAnswer(const std::string& className, UpcallAnswer answer) {
  std::lock_guard<std::mutex> lock(configMutex_);
  upcalls_[asciiLowerCopy(className)] = std::move(answer);
}

void BrokerCore::clearUpcall(std::string_view className) {
  std::lock_guard<std::mutex> lock(configMutex_);
  upcalls_.erase(asciiLowerCopy(className));
}

void BrokerCore::clearUpcalls() {
  std::lock_guard<std::mutex> lock(configMutex_);
  upcalls_.clear();
}

UpcallAnswer BrokerCore::upcallAnswer(std::string_view className) const {
  std::lock_guard<std::mutex> lock(configMutex_);
  const auto it = upcalls_.find(asciiLowerCopy(className));
  return it != upcalls_.end() ? it->second : UpcallAnswer{};
}

// ---- Recording --------------------------------------------------------------------------------

void BrokerCore::addCall(CallRecord record) {
  RequestState* request = currentRequest();
  record.requestId = request != nullptr ? request->id() : 0;
  if (request != nullptr) request->addCall(record);
  std::lock_guard<std::mutex> lock(recordsMutex_);
  calls_.push_back(std::move(record));
}

void BrokerCore::addTrace(TraceRecord record) {
  RequestState* request = currentRequest();
  record.requestId = request != nullptr ? request->id() : 0;
  std::shared_ptr<const TraceCallback> callback;
  {
    std::lock_guard<std::mutex> lock(recordsMutex_);
    callback = traceCallback_;
    if (recording()) traces_.push_back(record);
  }
  if (recording() && request != nullptr) request->addTrace(record);
  // Called outside the lock so that a callback may use the broker (read records, say).
  if (callback && *callback) (*callback)(record);
}

void BrokerCore::addLog(LogRecord record) {
  RequestState* request = currentRequest();
  record.requestId = request != nullptr ? request->id() : 0;
  std::shared_ptr<const LogCallback> callback;
  {
    std::lock_guard<std::mutex> lock(recordsMutex_);
    callback = logCallback_;
    if (recording()) logs_.push_back(record);
  }
  if (recording() && request != nullptr) request->addLog(record);
  if (callback && *callback) (*callback)(record);
}

void BrokerCore::addResult(RequestState* request, ResultEvent event) {
  event.requestId = request != nullptr ? request->id() : 0;
  if (recording()) {
    std::lock_guard<std::mutex> lock(recordsMutex_);
    results_.push_back(event);
  }
  if (request != nullptr) request->addResult(std::move(event));
}

std::vector<CallRecord> BrokerCore::calls() const {
  std::lock_guard<std::mutex> lock(recordsMutex_);
  return calls_;
}

std::vector<TraceRecord> BrokerCore::traces() const {
  std::lock_guard<std::mutex> lock(recordsMutex_);
  return traces_;
}

std::vector<LogRecord> BrokerCore::logs() const {
  std::lock_guard<std::mutex> lock(recordsMutex_);
  return logs_;
}

std::vector<ResultEvent> BrokerCore::results() const {
  std::lock_guard<std::mutex> lock(recordsMutex_);
  return results_;
}

void BrokerCore::clearRecords() {
  std::lock_guard<std::mutex> lock(recordsMutex_);
  calls_.clear();
  traces_.clear();
  logs_.clear();
  results_.clear();
}

void BrokerCore::setTraceCallback(TraceCallback callback) {
  auto shared = std::make_shared<const TraceCallback>(std::move(callback));
  std::lock_guard<std::mutex> lock(recordsMutex_);
  traceCallback_ = std::move(shared);
}

void BrokerCore::setLogCallback(LogCallback callback) {
  auto shared = std::make_shared<const LogCallback>(std::move(callback));
  std::lock_guard<std::mutex> lock(recordsMutex_);
  logCallback_ = std::move(shared);
}

// ---- Statuses ---------------------------------------------------------------------------------

CMPIStatus BrokerCore::makeStatus(CMPIrc rc, const std::string& message) {
  CMPIStatus status{rc, nullptr};
  if (rc != CMPI_RC_OK && !message.empty()) {
    status.msg = targetScope().make<StringObject>(message)->cmpi();
  }
  return status;
}

CMPIStatus BrokerCore::makeStatus(const StatusValue& value) {
  CMPIStatus status{value.rc, nullptr};
  if (value.message) status.msg = targetScope().make<StringObject>(*value.message)->cmpi();
  return status;
}

}  // namespace cmpihost::detail
