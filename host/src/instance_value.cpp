#include <algorithm>
#include <utility>

#include <cmpihost/value.h>

#include "text.h"

namespace cmpihost {

InstanceValue::InstanceValue(ObjectPathValue path) : path_(std::move(path)) {}

InstanceValue& InstanceValue::setPath(ObjectPathValue path) {
  path_ = std::move(path);
  return *this;
}

InstanceValue& InstanceValue::set(std::string name, Value value) {
  for (Property& property : properties_) {
    if (equalsIgnoringCase(property.name, name)) {
      property.value = std::move(value);
      return *this;
    }
  }
  properties_.push_back(Property{std::move(name), std::move(value)});
  return *this;
}

bool InstanceValue::remove(std::string_view name) {
  const auto it = std::find_if(properties_.begin(), properties_.end(),
                               [&](const Property& p) { return equalsIgnoringCase(p.name, name); });
  if (it == properties_.end()) return false;
  properties_.erase(it);
  return true;
}

const Value* InstanceValue::find(std::string_view name) const {
  for (const Property& property : properties_) {
    if (equalsIgnoringCase(property.name, name)) return &property.value;
  }
  return nullptr;
}

std::string InstanceValue::toString(bool multiLine) const {
  std::string text = "instance of " + path_.className();
  const bool pathSaysMore =
      !path_.nameSpace().empty() || !path_.host().empty() || !path_.keys().empty();
  if (pathSaysMore) text += " (" + path_.toString() + ")";
  if (properties_.empty()) return text + " { }";
  text += multiLine ? " {\n" : " {";
  for (const Property& property : properties_) {
    text += multiLine ? "  " : " ";
    text += property.name + " = " + property.value.toString() + ";";
    if (multiLine) text += "\n";
  }
  text += multiLine ? "}" : " }";
  return text;
}

bool operator==(const InstanceValue& a, const InstanceValue& b) {
  return a.path_ == b.path_ && a.properties_ == b.properties_;
}

std::ostream& operator<<(std::ostream& out, const InstanceValue& instance) {
  return out << instance.toString();
}

}  // namespace cmpihost
