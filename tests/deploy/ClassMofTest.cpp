// The class MOF against the providers: every property a provider sets must be declared by its
// class or inherited from the CIM schema, with the type the provider gives it, and the keys of
// the paths must be the keys of the class. A property added to a provider without adding it to
// the MOF, or a type changed on one side only, fails here.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <filesystem>
#include <map>
#include <memory>
#include <regex>
#include <set>
#include <string>
#include <vector>

#include "ClassModel.h"
#include "DeployFiles.h"
#include "TestSupport.h"
#include "cmpihost/cmpihost.h"

namespace {

namespace fs = std::filesystem;
using deploy::ClassModel;
using deploy::EffectiveProperty;
using deploy::Registration;

const char* const kNameSpace = "root/cimv2";
const char* const kSystemName = "classmof.example";

std::set<std::string> lowerNames(const std::set<std::string>& names) {
  std::set<std::string> result;
  for (std::string name : names) {
    for (char& c : name) c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    result.insert(name);
  }
  return result;
}

// ---------------------------------------------------------------------------------------------
// The MOF on its own
// ---------------------------------------------------------------------------------------------

TEST(ClassMof, DeclaresTheFiveClassesWithTheirCimSuperclasses) {
  const std::map<std::string, std::string> expected = {
      {"KESTA_BlueLight", "CIM_AlarmDevice"},
      {"KESTA_BlueLightCapabilities", "CIM_AlarmDeviceCapabilities"},
      {"KESTA_BlueLightElementCapabilities", "CIM_ElementCapabilities"},
      {"KESTA_BlueLightSystemDevice", "CIM_SystemDevice"},
      {"KESTA_ComputerSystem", "CIM_ComputerSystem"}};
  std::map<std::string, std::string> declared;
  for (const mof::Class& c : deploy::classMof().classes) declared[c.name] = c.superclass;
  EXPECT_EQ(declared, expected);
}

TEST(ClassMof, EveryChainEndsInTheCimSchema) {
  const ClassModel model(deploy::classMof());
  for (const mof::Class& c : deploy::classMof().classes) {
    EXPECT_NO_THROW(model.properties(c.name)) << c.name;
    EXPECT_TRUE(model.isA(c.name, "CIM_ManagedElement") ||
                model.isA(c.name, "CIM_ElementCapabilities") || model.isA(c.name, "CIM_Component"))
        << c.name;
  }
}

TEST(ClassMof, ClassesComeBeforeTheClassesThatUseThem) {
  // mofc and cimmof compile in file order; a class must be declared before it is referenced.
  std::set<std::string> seen;
  for (const mof::Class& c : deploy::classMof().classes) {
    for (const mof::Property& p : c.properties) {
      if (p.reference && deploy::classMof().findClass(p.type) != nullptr) {
        EXPECT_EQ(seen.count(p.type), 1u)
            << c.name << "." << p.name << " refers to " << p.type << " before it is declared";
      }
    }
    seen.insert(c.name);
  }
}

TEST(ClassMof, OverridesNameInheritedPropertiesOfCompatibleType) {
  const ClassModel model(deploy::classMof());
  for (const mof::Class& c : deploy::classMof().classes) {
    for (const mof::Property& p : c.properties) {
      SCOPED_TRACE(c.name + "." + p.name);
      const std::optional<EffectiveProperty> inherited = model.property(c.superclass, p.name);
      const mof::Qualifier* override = p.qualifier("Override");
      if (override == nullptr) {
        // A new property must not hide an inherited one by accident.
        EXPECT_FALSE(inherited) << "redeclares an inherited property without Override";
        continue;
      }
      EXPECT_EQ(override->value.scalar(), p.name);
      ASSERT_TRUE(inherited) << "overrides a property no superclass declares";
      EXPECT_EQ(p.reference, inherited->reference);
      EXPECT_EQ(p.array, inherited->array);
      if (p.reference) {
        EXPECT_TRUE(model.isA(p.type, inherited->type))
            << p.type << " does not derive from " << inherited->type;
      } else {
        EXPECT_EQ(p.type, inherited->type);
      }
      // Key cannot be switched off in a subclass; writing it again keeps the class readable.
      if (inherited->key) {
        EXPECT_TRUE(p.hasQualifier("Key"));
      }
    }
  }
}

TEST(ClassMof, AssociationsAreMarkedAsSuch) {
  for (const mof::Class& c : deploy::classMof().classes) {
    const ClassModel model(deploy::classMof());
    const bool association =
        model.isA(c.name, "CIM_ElementCapabilities") || model.isA(c.name, "CIM_Component");
    EXPECT_EQ(c.hasQualifier("Association"), association) << c.name;
  }
}

TEST(ClassMof, EveryClassHasAVersionAndADescription) {
  for (const mof::Class& c : deploy::classMof().classes) {
    EXPECT_TRUE(c.hasQualifier("Version")) << c.name;
    EXPECT_TRUE(c.hasQualifier("Description")) << c.name;
  }
}

// ---------------------------------------------------------------------------------------------
// What the providers set, found in the sources
// ---------------------------------------------------------------------------------------------

struct SourceProperty {
  std::string name;
  std::string type;  // MOF type text, "REF" for references
  std::string where;
};

std::vector<SourceProperty> propertiesInSources() {
  const std::string root = BLUELIGHT_DEPLOY_PROJECT_SOURCE_DIR;
  std::vector<std::string> files;
  for (const std::string& dir :
       {root + "/src", root + "/include", root + "/deploy/computersystem"}) {
    std::error_code error;
    for (const auto& entry : fs::directory_iterator(dir, error)) {
      const std::string ext = entry.path().extension().string();
      if (ext == ".cpp" || ext == ".h") files.push_back(entry.path().string());
    }
  }
  // CMSetProperty(instance, "Name", value, CMPI_type) and CMAddKey(path, "Name", value, type),
  // possibly spread over several lines.
  static const std::regex call(
      R"re((CMSetProperty|CMAddKey)\s*\(\s*[^,;]+,\s*"([A-Za-z_][A-Za-z0-9_]*)"\s*,[^;]*?,\s*(CMPI_[A-Za-z0-9_]+)\s*\))re");
  std::vector<SourceProperty> found;
  for (const std::string& file : files) {
    const std::string text = deploy::readText(file);
    for (auto it = std::sregex_iterator(text.begin(), text.end(), call);
         it != std::sregex_iterator(); ++it) {
      const std::smatch& match = *it;
      const auto line = std::count(text.begin(), text.begin() + match.position(0), '\n') + 1;
      const std::optional<std::string> type = deploy::mofTypeOf(match[3].str());
      found.push_back({match[2].str(), type ? *type : "unknown " + match[3].str(),
                       fs::path(file).filename().string() + ":" + std::to_string(line)});
    }
  }
  return found;
}

TEST(ClassMof, EveryPropertySetInTheSourcesIsDeclaredWithItsType) {
  const std::vector<SourceProperty> found = propertiesInSources();
  // The module and the computer-system provider set a few dozen; far fewer means the pattern no
  // longer matches how the sources set properties, and this test would check nothing.
  ASSERT_GE(found.size(), 20u);
  const ClassModel model(deploy::classMof());
  for (const SourceProperty& property : found) {
    bool declared = false;
    std::string seen;
    for (const mof::Class& c : deploy::classMof().classes) {
      const std::optional<EffectiveProperty> p = model.property(c.name, property.name);
      if (!p) continue;
      const std::string type = p->reference ? "REF" : p->typeText();
      seen += " " + c.name + ":" + p->typeText();
      if (type == property.type) declared = true;
    }
    EXPECT_TRUE(declared) << property.where << " sets " << property.name << " as " << property.type
                          << "; the class MOF has" << (seen.empty() ? " none" : seen);
  }
}

// ---------------------------------------------------------------------------------------------
// What the providers set, seen through the in-process host
// ---------------------------------------------------------------------------------------------

struct Served {
  std::map<std::string, std::vector<cmpihost::InstanceValue>> instances;
  std::map<std::string, std::vector<cmpihost::ObjectPathValue>> names;
};

class ServedClasses : public ::testing::Test {
 protected:
  static void SetUpTestSuite() {
    dir_ = std::make_unique<testsupport::TempDir>();
    testsupport::writeTree(dir_->file("tree.json"),
                           {testsupport::blueLight("1.2"), testsupport::blueLight("3.1", 20u, 3u),
                            testsupport::blueLight("5.1", std::nullopt, std::nullopt)});
    env_.push_back(std::make_unique<testsupport::ScopedEnv>("KESTA_INSTRUMENTATION",
                                                            "file:" + dir_->file("tree.json")));
    env_.push_back(
        std::make_unique<testsupport::ScopedEnv>("KESTA_SYSTEM_NAME", std::string(kSystemName)));
    env_.push_back(std::make_unique<testsupport::ScopedEnv>("VNLOG_SINK", std::string("none")));
    served_ = std::make_unique<Served>(collect());
  }

  static void TearDownTestSuite() {
    served_.reset();
    env_.clear();
    dir_.reset();
  }

  // Runs EnumerateInstanceNames and EnumerateInstances of every registered class through the
  // provider its sfcb registration names. The computer system goes first, so that the
  // association with the lights is built from the instance our own provider publishes.
  static Served collect() {
    Served served;
    std::vector<Registration> registrations = deploy::sfcbRegistrations();
    std::stable_partition(registrations.begin(), registrations.end(), [](const Registration& r) {
      return r.className == "KESTA_ComputerSystem";
    });
    cmpihost::Broker broker;
    for (const Registration& registration : registrations) {
      cmpihost::ProviderLibrary library(deploy::libraryPathFor(registration.location));
      cmpihost::InstanceMILoad load;
      {
        cmpihost::Request request(broker);
        load = cmpihost::createInstanceMI(library, registration.provider, broker, request);
      }
      if (!load.ok()) continue;  // RegistrationTest reports it
      const cmpihost::ObjectPathValue classPath(kNameSpace, registration.className);
      served.names[registration.className] =
          cmpihost::enumerateInstanceNames(broker, load.mi, classPath).paths();
      served.instances[registration.className] =
          cmpihost::enumerateInstances(broker, load.mi, classPath).instances();
      cmpihost::cleanup(broker, load.mi);
      if (registration.className == "KESTA_ComputerSystem") {
        broker.setUpcallInstances("KESTA_ComputerSystem", served.instances["KESTA_ComputerSystem"]);
      }
    }
    return served;
  }

  static std::unique_ptr<testsupport::TempDir> dir_;
  static std::vector<std::unique_ptr<testsupport::ScopedEnv>> env_;
  static std::unique_ptr<Served> served_;
};

std::unique_ptr<testsupport::TempDir> ServedClasses::dir_;
std::vector<std::unique_ptr<testsupport::ScopedEnv>> ServedClasses::env_;
std::unique_ptr<Served> ServedClasses::served_;

TEST_F(ServedClasses, EveryClassOfTheMofHasInstances) {
  for (const mof::Class& c : deploy::classMof().classes) {
    EXPECT_FALSE(served_->instances[c.name].empty()) << c.name;
    EXPECT_FALSE(served_->names[c.name].empty()) << c.name;
  }
}

TEST_F(ServedClasses, EveryPropertyAProviderSetsIsInItsClassWithTheSameType) {
  const ClassModel model(deploy::classMof());
  for (const auto& [className, instances] : served_->instances) {
    for (const cmpihost::InstanceValue& instance : instances) {
      EXPECT_EQ(instance.className(), className);
      for (const cmpihost::Property& property : instance.properties()) {
        SCOPED_TRACE(className + "." + property.name);
        const std::optional<EffectiveProperty> declared = model.property(className, property.name);
        ASSERT_TRUE(declared) << "the provider sets a property the class does not have";
        // Exact spelling, as clients match names from the class.
        EXPECT_EQ(property.name, declared->name);
        const std::optional<std::string> type = deploy::mofTypeOf(property.value.type());
        ASSERT_TRUE(type) << cmpihost::typeName(property.value.type());
        if (declared->reference) {
          ASSERT_EQ(*type, "REF");
          if (property.value.isNull()) continue;
          const std::string& target = property.value.asReference().className();
          EXPECT_TRUE(model.isA(target, declared->type))
              << "refers to " << target << ", the class declares REF " << declared->type;
        } else {
          EXPECT_EQ(*type, declared->typeText());
        }
      }
    }
  }
}

TEST_F(ServedClasses, PathsCarryExactlyTheKeysOfTheClass) {
  const ClassModel model(deploy::classMof());
  for (const auto& [className, paths] : served_->names) {
    std::set<std::string> keys;
    for (const auto& [id, property] : model.properties(className)) {
      if (property.key) keys.insert(id);
    }
    for (const cmpihost::ObjectPathValue& path : paths) {
      std::set<std::string> names;
      for (const cmpihost::KeyBinding& key : path.keys()) names.insert(key.name);
      EXPECT_EQ(lowerNames(names), keys) << path;
    }
  }
}

TEST_F(ServedClasses, TheLightsNameTheComputerSystemThatOurProviderPublishes) {
  const auto& systems = served_->instances["KESTA_ComputerSystem"];
  ASSERT_EQ(systems.size(), 1u);
  const cmpihost::Value* systemName = systems.front().find("Name");
  ASSERT_NE(systemName, nullptr);
  for (const cmpihost::InstanceValue& light : served_->instances["KESTA_BlueLight"]) {
    EXPECT_EQ(*light.find("SystemName"), *systemName) << light;
    EXPECT_EQ(light.find("SystemCreationClassName")->asString(), systems.front().className());
  }
  // Every light is a part of that system.
  const auto& parts = served_->instances["KESTA_BlueLightSystemDevice"];
  EXPECT_EQ(parts.size(), served_->instances["KESTA_BlueLight"].size());
  for (const cmpihost::InstanceValue& part : parts) {
    EXPECT_TRUE(part.find("GroupComponent")->asReference().equivalent(systems.front().path()))
        << part;
  }
}

}  // namespace
