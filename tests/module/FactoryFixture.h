// A fixture for the object factory: an in-process broker with a request that is current for the
// whole test, a tree of lights, a fixed system name and a captured log.
#ifndef BLUELIGHT_TESTS_FACTORYFIXTURE_H
#define BLUELIGHT_TESTS_FACTORYFIXTURE_H

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "BlueLightObjFactory.h"
#include "TestSupport.h"
#include "cmpihost/cmpihost.h"

namespace Kesta {
namespace BlueLightProvider {

// Reaches into a factory for the tests of its maps.
struct BlueLightFactoryInspector {
  static std::vector<BlueLight>& lights(BlueLightFactory& f) { return f._blueLights; }
  static std::vector<BlueLightCapabilities>& capabilities(BlueLightFactory& f) {
    return f._blueLightCapabilities;
  }
  static std::map<std::string, BlueLight>& lightMap(BlueLightFactory& f) { return f._blueLightMap; }
  static std::map<std::string, BlueLightCapabilities>& capabilitiesMap(BlueLightFactory& f) {
    return f._capabilitiesMap;
  }
  static void createCapabilitiesMap(BlueLightFactory& f) { f._createCapabilitiesMap(); }
  static void createBlueLightMap(BlueLightFactory& f) { f._createBlueLightMap(); }
};

}  // namespace BlueLightProvider
}  // namespace Kesta

namespace factorytest {

using Kesta::BlueLightProvider::BlueLight;
using Kesta::BlueLightProvider::BlueLightCapabilities;
using Kesta::BlueLightProvider::BlueLightFactory;
using Kesta::BlueLightProvider::BlueLightFactoryInspector;

inline const std::string kSystemName = "testhost.example";
inline const std::string kNameSpace = "root/cimv2";
inline const std::string kFactoryCategory = "Varnel.BlueLightObjFactory";

class FactoryTest : public ::testing::Test {
 protected:
  FactoryTest()
      : systemName_("KESTA_SYSTEM_NAME", kSystemName),
        language_("KESTA_LANGUAGE", std::string("en")),
        request_(std::make_unique<cmpihost::Request>(broker_)) {}

  // Points the instrumentation at a tree of `nodes`.
  void useTree(const std::vector<testsupport::Node>& nodes) {
    testsupport::writeTree(tree_, nodes);
    source_.emplace("KESTA_INSTRUMENTATION", "file:" + tree_);
  }

  const CMPIBroker* mb() const { return broker_.cmpi(); }

  // A key-less path of `className` in `nameSpace`, owned by the test's request.
  CMPIObjectPath* ref(const std::string& className = "KESTA_BlueLight",
                      const std::string& nameSpace = kNameSpace) {
    return request_->objectPath(cmpihost::ObjectPathValue(nameSpace, className));
  }
  CMPIString* text(const std::string& value) { return request_->string(value); }
  const char** properties(const cmpihost::PropertyList& list) {
    return request_->propertyList(list);
  }

  // The factory's log lines of one kind, with addresses and line numbers masked.
  std::vector<std::string> factoryLog(const std::string& kind = "LOG") const {
    std::vector<std::string> texts;
    for (const std::string& text : log_.texts(kFactoryCategory, kind)) {
      texts.push_back(testsupport::maskLineNumbers(testsupport::maskPointers(text)));
    }
    return texts;
  }

  std::vector<cmpihost::TraceRecord> brokerTraces() const { return broker_.traces(); }

  // A trace the provider sent during the test's request.
  cmpihost::TraceRecord brokerTrace(int level, const std::string& component,
                                    const std::string& text) const {
    cmpihost::TraceRecord record;
    record.level = level;
    record.component = component;
    record.text = text;
    record.requestId = request_->id();
    return record;
  }

  // A status that no broker call leaves behind, to see whether a method touched it.
  static CMPIStatus untouchedStatus() { return CMPIStatus{CMPI_RC_ERR_NOT_FOUND, nullptr}; }

  testsupport::TempDir dir_;
  std::string tree_ = dir_.file("tree.json");
  testsupport::ScopedEnv systemName_;
  testsupport::ScopedEnv language_;
  std::optional<testsupport::ScopedEnv> source_;
  testsupport::LogCapture log_;
  cmpihost::Broker broker_;
  std::unique_ptr<cmpihost::Request> request_;
};

// The traced parts of a record copy written the way the lines write them.
inline std::string entering(const std::string& function, const std::string& list) {
  return "ENTERING: " + function +
         "() in BlueLightObjFactory.cpp [Line: N],Parameters List: " + list;
}
inline std::string exiting(const std::string& function, const std::string& list) {
  return "EXITING: " + function +
         "() in BlueLightObjFactory.cpp [Line: N],Parameters List: " + list;
}

inline cmpihost::InstanceValue snapshot(const CMPIInstance* instance) {
  auto value = cmpihost::toInstanceValue(instance);
  EXPECT_TRUE(value.has_value());
  return value.value_or(cmpihost::InstanceValue());
}

inline cmpihost::ObjectPathValue snapshot(const CMPIObjectPath* path) {
  auto value = cmpihost::toObjectPathValue(path);
  EXPECT_TRUE(value.has_value());
  return value.value_or(cmpihost::ObjectPathValue());
}

inline std::vector<std::string> propertyNames(const cmpihost::InstanceValue& instance) {
  std::vector<std::string> names;
  for (const auto& property : instance.properties()) names.push_back(property.name);
  return names;
}

}  // namespace factorytest

#endif  // BLUELIGHT_TESTS_FACTORYFIXTURE_H
