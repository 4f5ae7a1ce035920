#include <cmpihost/broker.h>

#include "broker_core.h"

namespace cmpihost {

Broker::Broker(BrokerOptions options)
    : core_(std::make_unique<detail::BrokerCore>(std::move(options))) {}

Broker::~Broker() = default;

const CMPIBroker* Broker::cmpi() const { return core_->cmpi(); }
const BrokerOptions& Broker::options() const { return core_->options(); }

void Broker::setClassKeys(std::string className, std::vector<std::string> keyNames) {
  core_->setClassKeys(std::move(className), std::move(keyNames));
}

std::optional<std::vector<std::string>> Broker::classKeys(std::string_view className) const {
  return core_->classKeys(className);
}

void Broker::setSuperclass(const std::string& className, const std::string& superclassName) {
  core_->setSuperclass(className, superclassName);
}

void Broker::setUpcallInstances(const std::string& className,
                                std::vector<InstanceValue> instances) {
  detail::UpcallAnswer answer;
  answer.instances = std::move(instances);
  core_->setUpcallAnswer(className, std::move(answer));
}

void Broker::setUpcallFailure(const std::string& className, StatusValue status) {
  detail::UpcallAnswer answer;
  answer.fail = true;
  answer.status = std::move(status);
  core_->setUpcallAnswer(className, std::move(answer));
}

void Broker::clearUpcall(std::string_view className) { core_->clearUpcall(className); }
void Broker::clearUpcalls() { core_->clearUpcalls(); }

void Broker::setRecording(bool on) { core_->setRecording(on); }
bool Broker::recording() const { return core_->recording(); }
std::vector<CallRecord> Broker::calls() const { return core_->calls(); }
std::vector<TraceRecord> Broker::traces() const { return core_->traces(); }
std::vector<LogRecord> Broker::logs() const { return core_->logs(); }
std::vector<ResultEvent> Broker::results() const { return core_->results(); }
void Broker::clearRecords() { core_->clearRecords(); }
void Broker::setTraceCallback(TraceCallback callback) {
  core_->setTraceCallback(std::move(callback));
}
void Broker::setLogCallback(LogCallback callback) { core_->setLogCallback(std::move(callback)); }

FaultId Broker::armFault(const Fault& fault) { return core_->faults().arm(fault); }
bool Broker::disarmFault(FaultId id) { return core_->faults().disarm(id); }
void Broker::clearFaults() { core_->faults().clear(); }
std::uint64_t Broker::faultFireCount(FaultId id) const { return core_->faults().fireCount(id); }
CreationCounts Broker::creationCounts() const { return core_->faults().counts(); }
void Broker::resetCreationCounts() { core_->faults().resetCounts(); }

std::size_t Broker::liveObjectCount() const { return core_->liveObjects(); }
std::size_t Broker::brokerOwnedObjectCount() const { return core_->rootScope().size(); }

}  // namespace cmpihost
