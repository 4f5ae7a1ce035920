#include "Dispatch.h"

#include <cmpihost/driver.h>

#include <utility>

#include "PathText.h"
#include "ProviderSession.h"
#include "TextForms.h"
#include "UsageError.h"

namespace bluelight::cli {

using cmpihost::ObjectPathValue;
using cmpihost::Value;

namespace {

cmpihost::OptionalText canonical(const std::optional<std::string>& className) {
  if (!className) return std::nullopt;
  return canonicalClassName(*className);
}

std::string textArgument(const cmpihost::OptionalText& text) {
  return text ? quote(*text) : std::string("NULL");
}

std::string propertyArgument(const cmpihost::PropertyList& properties) {
  if (!properties) return "NULL";
  std::string text = "{";
  const char* separator = "";
  for (const std::string& name : *properties) {
    text += separator + name;
    separator = ", ";
  }
  return text + "}";
}

cmpihost::Outcome call(const Plan& plan, const Plan::Call& target, ProviderSession& session) {
  cmpihost::Broker& broker = session.broker();
  cmpihost::RequestOptions options;
  options.nameSpace = plan.target.nameSpace();
  const std::string provider = target.provider->name;
  switch (plan.operation) {
    case Operation::EnumerateInstanceNames:
      return cmpihost::enumerateInstanceNames(broker, session.instanceMI(provider), plan.target,
                                              options);
    case Operation::EnumerateInstances:
      return cmpihost::enumerateInstances(broker, session.instanceMI(provider), plan.target,
                                          plan.properties, options);
    case Operation::GetInstance:
      return cmpihost::getInstance(broker, session.instanceMI(provider), plan.target,
                                   plan.properties, options);
    case Operation::Associators:
      return cmpihost::associators(broker, session.associationMI(provider), plan.target,
                                   plan.assocClass, plan.resultClass, plan.role, plan.resultRole,
                                   plan.properties, options);
    case Operation::AssociatorNames:
      return cmpihost::associatorNames(broker, session.associationMI(provider), plan.target,
                                       plan.assocClass, plan.resultClass, plan.role,
                                       plan.resultRole, options);
    case Operation::References:
      return cmpihost::references(broker, session.associationMI(provider), plan.target,
                                  plan.resultClass, plan.role, plan.properties, options);
    case Operation::ReferenceNames:
      return cmpihost::referenceNames(broker, session.associationMI(provider), plan.target,
                                      plan.resultClass, plan.role, options);
  }
  return {};
}

const char* functionName(Operation operation) {
  switch (operation) {
    case Operation::EnumerateInstanceNames:
      return "enumerateInstanceNames";
    case Operation::EnumerateInstances:
      return "enumerateInstances";
    case Operation::GetInstance:
      return "getInstance";
    case Operation::Associators:
      return "associators";
    case Operation::AssociatorNames:
      return "associatorNames";
    case Operation::References:
      return "references";
    case Operation::ReferenceNames:
      return "referenceNames";
  }
  return "?";
}

}  // namespace

ObjectPathValue withCanonicalClassNames(const ObjectPathValue& path) {
  ObjectPathValue result = path;
  result.setClassName(canonicalClassName(path.className()));
  for (const cmpihost::KeyBinding& key : path.keys()) {
    if (key.value.type() == CMPI_ref && !key.value.isNull()) {
      result.addKey(key.name, Value::reference(withCanonicalClassNames(key.value.asReference())));
    }
  }
  return result;
}

Plan planOperation(const CommandLine& line) {
  Plan plan;
  plan.operation = line.operation;
  const OperationInfo& info = infoOf(line.operation);
  plan.target =
      withCanonicalClassNames(info.takesClassName ? parseClassPath(line.argument, line.nameSpace)
                                                  : parseObjectPath(line.argument, line.nameSpace));
  plan.properties = line.properties;
  plan.role = line.role;
  plan.resultRole = line.resultRole;
  plan.assocClass = canonical(line.assocClass);
  plan.resultClass = canonical(line.resultClass);

  if (!info.isAssociation) {
    const ProviderInfo* provider = instanceProviderFor(plan.target.className());
    if (provider == nullptr) {
      throw NoProviderError("no provider serves class " + plan.target.className());
    }
    plan.calls.push_back({provider, MIKind::Instance});
    return plan;
  }

  // Associators name the association class in AssocClass, References in ResultClass.
  const cmpihost::OptionalText& associationClass =
      info.takesAssocClass ? plan.assocClass : plan.resultClass;
  if (associationClass) {
    const ProviderInfo* provider = associationProviderFor(*associationClass);
    if (provider == nullptr) {
      throw NoProviderError("no provider serves association class " + *associationClass);
    }
    plan.calls.push_back({provider, MIKind::Association});
    return plan;
  }
  for (const ProviderInfo* provider : associationProviders()) {
    plan.calls.push_back({provider, MIKind::Association});
  }
  plan.severalAsked = plan.calls.size() > 1;
  return plan;
}

void prepare(const Plan& plan, ProviderSession& session) {
  for (const Plan::Call& call : plan.calls) {
    if (call.kind == MIKind::Instance) {
      session.instanceMI(call.provider->name);
    } else {
      session.associationMI(call.provider->name);
    }
  }
}

std::string describeCall(const Plan& plan, const Plan::Call& call) {
  std::string text = std::string(call.provider->name) + "." + functionName(plan.operation) + "(" +
                     formatPath(plan.target);
  switch (plan.operation) {
    case Operation::EnumerateInstanceNames:
      break;
    case Operation::EnumerateInstances:
    case Operation::GetInstance:
      text += ", properties=" + propertyArgument(plan.properties);
      break;
    case Operation::Associators:
    case Operation::AssociatorNames:
      text += ", assocClass=" + textArgument(plan.assocClass) +
              ", resultClass=" + textArgument(plan.resultClass) +
              ", role=" + textArgument(plan.role) + ", resultRole=" + textArgument(plan.resultRole);
      if (plan.operation == Operation::Associators) {
        text += ", properties=" + propertyArgument(plan.properties);
      }
      break;
    case Operation::References:
    case Operation::ReferenceNames:
      text +=
          ", resultClass=" + textArgument(plan.resultClass) + ", role=" + textArgument(plan.role);
      if (plan.operation == Operation::References) {
        text += ", properties=" + propertyArgument(plan.properties);
      }
      break;
  }
  return text + ")";
}

Report execute(const Plan& plan, ProviderSession& session, std::ostream* verboseLog) {
  std::vector<ProviderRun> runs;
  for (const Plan::Call& target : plan.calls) {
    if (verboseLog != nullptr) *verboseLog << "call: " << describeCall(plan, target) << "\n";
    runs.push_back({target.provider->name, target.kind, call(plan, target, session)});
    if (verboseLog != nullptr) {
      *verboseLog << "returned: " << runs.back().outcome.status.toString() << "\n";
    }
  }
  return buildReport(plan.operation, plan.target, std::move(runs), plan.severalAsked);
}

}  // namespace bluelight::cli
