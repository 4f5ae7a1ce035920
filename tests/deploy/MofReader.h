// Just enough of a MOF reader for the deployment tests: class declarations with their qualifiers
// and properties, and instance declarations (the OpenPegasus registration) with their values.
// It reads what our own files use and throws MofError, naming the line, at anything else, so a
// test never passes because the reader skipped over something it did not understand.
#ifndef BLUELIGHT_TESTS_DEPLOY_MOFREADER_H
#define BLUELIGHT_TESTS_DEPLOY_MOFREADER_H

#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace mof {

class MofError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

// A value as written: scalars as their text (strings without quotes and with escapes resolved,
// numbers and true/false as written), arrays as their elements. NULL is `null`.
struct Value {
  bool null = false;
  bool array = false;
  std::vector<std::string> items;

  // The single item of a scalar; throws MofError for arrays and NULL.
  const std::string& scalar() const;
};

struct Qualifier {
  std::string name;
  Value value;  // a qualifier written without a value (e.g. Key) has the single item "true"
};

struct Property {
  std::string name;
  std::string type;  // "string", "uint16", ...; for references the referenced class
  bool reference = false;
  bool array = false;
  std::vector<Qualifier> qualifiers;

  const Qualifier* qualifier(std::string_view name) const;
  bool hasQualifier(std::string_view name) const { return qualifier(name) != nullptr; }
  // "uint16[]", "string", "REF KESTA_BlueLight": for messages and comparisons.
  std::string typeText() const;
};

struct Class {
  std::string name;
  std::string superclass;  // empty for a root class
  std::vector<Qualifier> qualifiers;
  std::vector<Property> properties;
  std::vector<std::string> methods;
  int line = 0;

  const Qualifier* qualifier(std::string_view name) const;
  bool hasQualifier(std::string_view name) const { return qualifier(name) != nullptr; }
  const Property* property(std::string_view name) const;
};

struct Instance {
  std::string className;
  std::vector<std::pair<std::string, Value>> values;
  int line = 0;

  // The value of a property (name compared ignoring case), or null when it is not set.
  const Value* value(std::string_view name) const;
  // The scalar text of a property; throws MofError when it is missing, NULL or an array.
  const std::string& text(std::string_view name) const;
};

struct Document {
  std::vector<Class> classes;
  std::vector<Instance> instances;

  const Class* findClass(std::string_view name) const;
  std::vector<const Instance*> instancesOf(std::string_view className) const;
};

Document parse(std::string_view text);
Document parseFile(const std::string& path);

// CIM names compare ignoring ASCII case.
bool sameName(std::string_view a, std::string_view b);

}  // namespace mof

#endif  // BLUELIGHT_TESTS_DEPLOY_MOFREADER_H
