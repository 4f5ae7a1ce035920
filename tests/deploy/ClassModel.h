// The classes as an object manager sees them once the class MOF is compiled on top of the CIM
// schema: each KESTA class with everything it inherits, declarations in subclasses winning.
#ifndef BLUELIGHT_TESTS_DEPLOY_CLASSMODEL_H
#define BLUELIGHT_TESTS_DEPLOY_CLASSMODEL_H

#include <cmpidt.h>

#include <map>
#include <optional>
#include <string>

#include "CimSchemaTable.h"
#include "MofReader.h"

namespace deploy {

struct EffectiveProperty {
  std::string name;
  std::string type;  // MOF data type, or the referenced class
  bool array = false;
  bool reference = false;
  bool key = false;
  std::string declaredIn;  // the most derived class that declares it

  std::string typeText() const {
    if (reference) return "REF " + type;
    return array ? type + "[]" : type;
  }
};

// Looks classes up in the class MOF first, then in the schema table.
class ClassModel {
 public:
  explicit ClassModel(const mof::Document& doc) : doc_(doc) {}

  // True when the class is known to either.
  bool knows(const std::string& className) const;
  // The superclass, or nullopt for a root class or an unknown one.
  std::optional<std::string> superclassOf(const std::string& className) const;
  // True when `className` is `ancestor` or derives from it (names compared ignoring case).
  bool isA(const std::string& className, const std::string& ancestor) const;
  // Every property of the class, keyed by lower-case name. Throws std::runtime_error when the
  // chain reaches a class neither source knows.
  std::map<std::string, EffectiveProperty> properties(const std::string& className) const;
  // The property of that name (any case), or nullopt.
  std::optional<EffectiveProperty> property(const std::string& className,
                                            const std::string& name) const;

 private:
  const mof::Document& doc_;
};

// The MOF type text of a CMPI type code: "uint16", "string[]", "REF" (for CMPI_ref); nullopt for
// codes that have no MOF type.
std::optional<std::string> mofTypeOf(CMPIType type);
// The same for the spelling of a CMPI type constant in source code ("CMPI_uint16A").
std::optional<std::string> mofTypeOf(const std::string& cmpiConstant);

}  // namespace deploy

#endif  // BLUELIGHT_TESTS_DEPLOY_CLASSMODEL_H
