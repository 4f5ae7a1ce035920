#include "ClassModel.h"

#include <algorithm>
#include <cctype>
#include <stdexcept>
#include <vector>

namespace deploy {

namespace {

std::string lower(std::string text) {
  std::transform(text.begin(), text.end(), text.begin(),
                 [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
  return text;
}

const cimschema::Class* schemaClass(const std::string& name) {
  for (const cimschema::Class& c : cimschema::classes()) {
    if (mof::sameName(c.name, name)) return &c;
  }
  return nullptr;
}

struct TypeName {
  CMPIType type;
  const char* mof;
  const char* constant;
};

const TypeName kTypes[] = {
    {CMPI_boolean, "boolean", "boolean"},    {CMPI_char16, "char16", "char16"},
    {CMPI_uint8, "uint8", "uint8"},          {CMPI_uint16, "uint16", "uint16"},
    {CMPI_uint32, "uint32", "uint32"},       {CMPI_uint64, "uint64", "uint64"},
    {CMPI_sint8, "sint8", "sint8"},          {CMPI_sint16, "sint16", "sint16"},
    {CMPI_sint32, "sint32", "sint32"},       {CMPI_sint64, "sint64", "sint64"},
    {CMPI_real32, "real32", "real32"},       {CMPI_real64, "real64", "real64"},
    {CMPI_string, "string", "string"},       {CMPI_chars, "string", "chars"},
    {CMPI_dateTime, "datetime", "dateTime"}, {CMPI_ref, "REF", "ref"},
};

}  // namespace

bool ClassModel::knows(const std::string& className) const {
  return doc_.findClass(className) != nullptr || schemaClass(className) != nullptr;
}

std::optional<std::string> ClassModel::superclassOf(const std::string& className) const {
  if (const mof::Class* c = doc_.findClass(className)) {
    if (c->superclass.empty()) return std::nullopt;
    return c->superclass;
  }
  if (const cimschema::Class* c = schemaClass(className)) {
    if (c->superclass.empty()) return std::nullopt;
    return c->superclass;
  }
  return std::nullopt;
}

bool ClassModel::isA(const std::string& className, const std::string& ancestor) const {
  std::optional<std::string> current = className;
  for (int depth = 0; current && depth < 64; ++depth) {
    if (mof::sameName(*current, ancestor)) return true;
    current = superclassOf(*current);
  }
  return false;
}

std::map<std::string, EffectiveProperty> ClassModel::properties(
    const std::string& className) const {
  // The chain from the class up to its root.
  std::vector<std::string> chain;
  std::optional<std::string> current = className;
  while (current) {
    if (!knows(*current)) {
      throw std::runtime_error("class " + *current + " (in the chain of " + className +
                               ") is neither in the class MOF nor in the schema table");
    }
    if (chain.size() > 64) throw std::runtime_error("the chain of " + className + " loops");
    chain.push_back(*current);
    current = superclassOf(*current);
  }

  // Root first, so that declarations further down replace inherited ones; Key is never lost,
  // since it cannot be overridden to false.
  std::map<std::string, EffectiveProperty> result;
  for (auto it = chain.rbegin(); it != chain.rend(); ++it) {
    auto put = [&](EffectiveProperty property) {
      const std::string id = lower(property.name);
      const auto inherited = result.find(id);
      if (inherited != result.end()) property.key = property.key || inherited->second.key;
      result[id] = std::move(property);
    };
    if (const mof::Class* c = doc_.findClass(*it)) {
      for (const mof::Property& p : c->properties) {
        put({p.name, p.type, p.array, p.reference, p.hasQualifier("Key"), c->name});
      }
    } else if (const cimschema::Class* s = schemaClass(*it)) {
      for (const cimschema::Property& p : s->properties) {
        put({p.name, p.type, p.array, p.reference, p.key, s->name});
      }
    }
  }
  return result;
}

std::optional<EffectiveProperty> ClassModel::property(const std::string& className,
                                                      const std::string& name) const {
  const auto all = properties(className);
  const auto found = all.find(lower(name));
  if (found == all.end()) return std::nullopt;
  return found->second;
}

std::optional<std::string> mofTypeOf(CMPIType type) {
  const bool array = (type & CMPI_ARRAY) != 0;
  const CMPIType element = static_cast<CMPIType>(type & ~CMPI_ARRAY);
  for (const TypeName& entry : kTypes) {
    if (entry.type == element) return std::string(entry.mof) + (array ? "[]" : "");
  }
  return std::nullopt;
}

std::optional<std::string> mofTypeOf(const std::string& cmpiConstant) {
  if (cmpiConstant.rfind("CMPI_", 0) != 0) return std::nullopt;
  std::string name = cmpiConstant.substr(5);
  for (const TypeName& entry : kTypes) {
    if (name == entry.constant) return std::string(entry.mof);
    if (name == std::string(entry.constant) + "A") return std::string(entry.mof) + "[]";
  }
  return std::nullopt;
}

}  // namespace deploy
