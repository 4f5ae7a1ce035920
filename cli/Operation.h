// The CIM read operations the tool can send, with their command names and what each accepts.
#pragma once

#include <string_view>
#include <vector>

namespace bluelight::cli {

enum class Operation {
  EnumerateInstanceNames,
  EnumerateInstances,
  GetInstance,
  Associators,
  AssociatorNames,
  References,
  ReferenceNames
};

/// Everything the tool needs to know about one operation.
struct OperationInfo {
  Operation operation;
  const char* shortName;  ///< e.g. "ei"
  const char* longName;   ///< e.g. "enumerate-instances"
  const char* cimName;    ///< e.g. "EnumerateInstances"
  bool takesClassName;    ///< the argument is a class (else an object path)
  bool returnsInstances;  ///< the result is instances (else object paths)
  bool isAssociation;     ///< served by association MIs
  bool takesProperties;   ///< accepts --properties
  bool takesAssocClass;  ///< accepts --assoc-class and --result-role (Associators, AssociatorNames)
};

/// The operations in the order the help lists them.
const std::vector<OperationInfo>& allOperations();
const OperationInfo& infoOf(Operation operation);
/// The operation called `name` (short or long command name, or the CIM name, ignoring case).
const OperationInfo* findOperation(std::string_view name);

}  // namespace bluelight::cli
