#include "Operation.h"

#include <stdexcept>

#include "text/Text.h"

namespace bluelight::cli {

const std::vector<OperationInfo>& allOperations() {
  static const std::vector<OperationInfo> operations = {
      {Operation::EnumerateInstanceNames, "ein", "enumerate-instance-names",
       "EnumerateInstanceNames", true, false, false, false, false},
      {Operation::EnumerateInstances, "ei", "enumerate-instances", "EnumerateInstances", true, true,
       false, true, false},
      {Operation::GetInstance, "gi", "get-instance", "GetInstance", false, true, false, true,
       false},
      {Operation::Associators, "ai", "associators", "Associators", false, true, true, true, true},
      {Operation::AssociatorNames, "ain", "associator-names", "AssociatorNames", false, false, true,
       false, true},
      {Operation::References, "ri", "references", "References", false, true, true, true, false},
      {Operation::ReferenceNames, "rin", "reference-names", "ReferenceNames", false, false, true,
       false, false},
  };
  return operations;
}

const OperationInfo& infoOf(Operation operation) {
  for (const OperationInfo& info : allOperations()) {
    if (info.operation == operation) return info;
  }
  throw std::logic_error("unknown operation");
}

const OperationInfo* findOperation(std::string_view name) {
  for (const OperationInfo& info : allOperations()) {
    if (Kesta::platform::equalsIgnoringCase(name, info.shortName) ||
        Kesta::platform::equalsIgnoringCase(name, info.longName) ||
        Kesta::platform::equalsIgnoringCase(name, info.cimName)) {
      return &info;
    }
  }
  return nullptr;
}

}  // namespace bluelight::cli
