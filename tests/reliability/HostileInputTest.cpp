// Hostile input: every read operation of the provider library, loaded into the in-process host
// as an object manager loads it, fed with what a careless client or a broken instrumentation tree
// can send: odd property lists, object paths that name nothing the provider serves, null
// arguments, trees at and past the 16-bit counts the module works with, long descriptions and
// printf directives, and a tree file rewritten while the operations read it.
//
// Where the module's documented behaviour says what must come back, it is compared exactly;
// elsewhere the operation must return a clear status and readable objects, never crash.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cstdio>
#include <fstream>
#include <functional>
#include <iostream>
#include <optional>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "BlackboxFixture.h"

namespace {

using blackbox::BlackboxTest;
using cmpihost::InstanceValue;
using cmpihost::ObjectPathValue;
using cmpihost::ObjectState;
using cmpihost::OptionalText;
using cmpihost::Outcome;
using cmpihost::PropertyList;
using cmpihost::ResultEvent;
using cmpihost::ResultKind;
using cmpihost::StatusValue;
using cmpihost::Value;

const std::string kEcClass = "KESTA_BlueLightElementCapabilities";
const std::string kSdClass = "KESTA_BlueLightSystemDevice";
const std::string kOtherNameSpace = "root/other";

const std::vector<std::string> kLightKeys = {"CreationClassName", "DeviceID",
                                             "SystemCreationClassName", "SystemName"};
const std::vector<std::string> kLightProperties = {
    "Caption",     "Description",       "Name",         "ElementName",  "RequestedState",
    "HealthState", "OperationalStatus", "AudibleAlarm", "VisibleAlarm", "MotionAlarm",
    "AlarmState"};
const std::string kAlarmStates = "RequestedAlarmStatesSupported";

std::string codes(const Outcome& outcome) {
  std::string text;
  for (const ResultEvent& event : outcome.results) {
    std::string code = event.kind == ResultKind::Instance     ? "I"
                       : event.kind == ResultKind::ObjectPath ? "P"
                       : event.kind == ResultKind::Done       ? "D"
                                                              : "?";
    if (event.state == ObjectState::NullPointer) code += "0";
    if (event.state == ObjectState::NullHandle) code += "h";
    text += code;
  }
  return text;
}

std::vector<std::string> propertyNames(const InstanceValue& instance) {
  std::vector<std::string> names;
  for (const cmpihost::Property& property : instance.properties()) names.push_back(property.name);
  return names;
}

// Every object handed over is readable; the status is OK or a failure code.
void expectSane(const Outcome& outcome) {
  const std::set<CMPIrc> allowed = {CMPI_RC_OK, CMPI_RC_ERR_FAILED, CMPI_RC_ERR_NOT_FOUND,
                                    CMPI_RC_ERR_INVALID_PARAMETER, CMPI_RC_ERR_INVALID_HANDLE};
  EXPECT_EQ(allowed.count(outcome.status.rc), 1u) << outcome.status;
  EXPECT_LE(outcome.doneCount, 1u);
  for (const ResultEvent& event : outcome.results) {
    if (event.kind == ResultKind::Done) continue;
    EXPECT_EQ(event.state, ObjectState::Valid) << event;
  }
}

class HostileInputTest : public BlackboxTest {
 public:
  using BlackboxTest::broker_;
  using BlackboxTest::tree_;

 protected:
  void SetUp() override {
    useTree({testsupport::blueLight("1.3"), testsupport::blueLight("1.1"),
             testsupport::blueLight("1.2")});
    useComputerSystems({"cs1.example", "cs2.example"});
    light_ = instanceMI(blackbox::kLightProvider);
    caps_ = instanceMI(blackbox::kCapabilitiesProvider);
    ecInstances_ = instanceMI(blackbox::kElementCapabilitiesProvider);
    sdInstances_ = instanceMI(blackbox::kSystemDeviceProvider);
    ec_ = associationMI(blackbox::kElementCapabilitiesProvider);
    sd_ = associationMI(blackbox::kSystemDeviceProvider);
    lightRef_ = lightPath("Blue Light:1.2");
    capsRef_ = capabilitiesPath();
    csRef_ = computerSystemPath("cs1.example");
  }

 public:
  CMPIInstanceMI* light_ = nullptr;
  CMPIInstanceMI* caps_ = nullptr;
  CMPIInstanceMI* ecInstances_ = nullptr;
  CMPIInstanceMI* sdInstances_ = nullptr;
  CMPIAssociationMI* ec_ = nullptr;
  CMPIAssociationMI* sd_ = nullptr;
  ObjectPathValue lightRef_, capsRef_, csRef_;
};

// ---- Property lists ----------------------------------------------------------------------------

struct NamedList {
  std::string name;
  PropertyList list;
};

std::vector<NamedList> hostileLists() {
  std::vector<std::string> many;
  many.reserve(1000);
  for (int i = 0; i < 998; ++i) many.push_back("Unknown" + std::to_string(i));
  many.emplace_back("AlarmState");
  many.push_back(kAlarmStates);
  return {
      {"null", std::nullopt},
      {"empty", std::vector<std::string>{}},
      {"unknown names", std::vector<std::string>{"NoSuchProperty", "Bogus", ""}},
      {"duplicates", std::vector<std::string>{"ElementName", "ElementName", kAlarmStates,
                                              kAlarmStates, "Caption"}},
      {"wrong case",
       std::vector<std::string>{"elementname", "CAPTION", "requestedalarmstatessupported"}},
      {"1,000 names", many},
      {"not UTF-8",
       std::vector<std::string>{"\xff\xfe", "Element\x80Name", "\xc3(", "Caption\xed\xa0\x80"}},
  };
}

bool listed(const PropertyList& list, const std::string& name) {
  if (!list) return true;
  for (const std::string& entry : *list) {
    if (entry == name) return true;
  }
  return false;
}

// The properties a light instance carries for `list`: the keys always, then, in the order they
// are set, every other property that is named exactly (case and bytes) or all for a null list.
std::vector<std::string> lightProperties(const PropertyList& list) {
  std::vector<std::string> names = kLightKeys;
  for (const std::string& name : kLightProperties) {
    if (listed(list, name)) names.push_back(name);
  }
  return names;
}

std::vector<std::string> capabilitiesProperties(const PropertyList& list) {
  std::vector<std::string> names = {"InstanceID"};
  if (listed(list, kAlarmStates)) names.push_back(kAlarmStates);
  return names;
}

enum class Rule { Light, Capabilities, AnyReadable };

struct PropertyOperation {
  std::string name;
  Rule rule;
  std::string expectedCodes;  // with the tree of three lights and two computer systems
  std::function<Outcome(HostileInputTest&, const PropertyList&)> run;
};

class PropertyListTest : public HostileInputTest {
 public:
  std::vector<PropertyOperation> operations() {
    return {
        {"BlueLight_EnumInstances", Rule::Light, "IIID",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::enumerateInstances(t.broker_, t.light_, classPath("KESTA_BlueLight"),
                                               p);
         }},
        {"BlueLight_GetInstance", Rule::Light, "ID",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::getInstance(t.broker_, t.light_, t.lightRef_, p);
         }},
        {"BlueLightCapabilities_EnumInstances", Rule::Capabilities, "ID",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::enumerateInstances(t.broker_, t.caps_,
                                               classPath("KESTA_BlueLightCapabilities"), p);
         }},
        {"BlueLightCapabilities_GetInstance", Rule::Capabilities, "ID",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::getInstance(t.broker_, t.caps_, t.capsRef_, p);
         }},
        {"BlueLightElementCapabilities_EnumInstances", Rule::AnyReadable, "IIID",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::enumerateInstances(t.broker_, t.ecInstances_, classPath(kEcClass), p);
         }},
        {"BlueLightSystemDevice_EnumInstances", Rule::AnyReadable, "IIIIIID",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::enumerateInstances(t.broker_, t.sdInstances_, classPath(kSdClass), p);
         }},
        {"BlueLightElementCapabilities_Associators_FromLight", Rule::Capabilities, "I",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::associators(t.broker_, t.ec_, t.lightRef_, kEcClass, std::nullopt,
                                        std::nullopt, std::nullopt, p);
         }},
        {"BlueLightElementCapabilities_Associators_FromCapabilities", Rule::Light, "III",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::associators(t.broker_, t.ec_, t.capsRef_, kEcClass, std::nullopt,
                                        std::nullopt, std::nullopt, p);
         }},
        {"BlueLightSystemDevice_Associators_FromComputerSystem", Rule::Light, "III",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::associators(t.broker_, t.sd_, t.csRef_, kSdClass, std::nullopt,
                                        std::nullopt, std::nullopt, p);
         }},
        {"BlueLightSystemDevice_Associators_FromLight", Rule::AnyReadable, "II",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::associators(t.broker_, t.sd_, t.lightRef_, kSdClass, std::nullopt,
                                        std::nullopt, std::nullopt, p);
         }},
        {"BlueLightElementCapabilities_References_FromLight", Rule::AnyReadable, "I",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::references(t.broker_, t.ec_, t.lightRef_, std::nullopt, std::nullopt,
                                       p);
         }},
        {"BlueLightSystemDevice_References_FromComputerSystem", Rule::AnyReadable, "III",
         [](HostileInputTest& t, const PropertyList& p) {
           return cmpihost::references(t.broker_, t.sd_, t.csRef_, std::nullopt, std::nullopt, p);
         }},
    };
  }
};

TEST_F(PropertyListTest, EveryOperationTakesEveryHostileList) {
  unsigned cases = 0;
  for (const PropertyOperation& op : operations()) {
    for (const NamedList& list : hostileLists()) {
      SCOPED_TRACE(op.name + " with a property list: " + list.name);
      const Outcome outcome = op.run(*this, list.list);
      ++cases;
      expectSane(outcome);
      EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
      EXPECT_EQ(codes(outcome), op.expectedCodes);
      for (const InstanceValue& instance : outcome.instances()) {
        if (op.rule == Rule::Light) {
          EXPECT_EQ(propertyNames(instance), lightProperties(list.list)) << instance;
        } else if (op.rule == Rule::Capabilities) {
          EXPECT_EQ(propertyNames(instance), capabilitiesProperties(list.list)) << instance;
        }
      }
    }
  }
  RecordProperty("cases", static_cast<int>(cases));
}

// ---- Object paths ------------------------------------------------------------------------------

// How the path of an operation's source is spoilt.
enum class Spoil { NoKeys, UnknownClass, OtherNameSpace, WrongKeyType, NullKeys };

const char* spoilName(Spoil spoil) {
  switch (spoil) {
    case Spoil::NoKeys:
      return "no keys";
    case Spoil::UnknownClass:
      return "unknown class";
    case Spoil::OtherNameSpace:
      return "other namespace";
    case Spoil::WrongKeyType:
      return "keys of the wrong type";
    case Spoil::NullKeys:
      return "null-valued keys";
  }
  return "?";
}

ObjectPathValue spoilt(const ObjectPathValue& path, Spoil spoil) {
  ObjectPathValue result = path;
  switch (spoil) {
    case Spoil::NoKeys:
      result.clearKeys();
      break;
    case Spoil::UnknownClass:
      result.setClassName("ACME_NoSuchClass");
      break;
    case Spoil::OtherNameSpace:
      result.setNameSpace(kOtherNameSpace);
      break;
    case Spoil::WrongKeyType:
      for (const cmpihost::KeyBinding& key : path.keys()) {
        result.addKey(key.name, Value::uint16(7));
      }
      break;
    case Spoil::NullKeys:
      for (const cmpihost::KeyBinding& key : path.keys()) {
        result.addKey(key.name, Value::null(key.value.type()));
      }
      break;
  }
  return result;
}

const std::vector<Spoil> kSpoils = {Spoil::NoKeys, Spoil::UnknownClass, Spoil::OtherNameSpace,
                                    Spoil::WrongKeyType, Spoil::NullKeys};

const std::string kNoKeyText = "At least one key should be passed";

TEST_F(HostileInputTest, InstanceEnumerationsLookOnlyAtTheNamespaceOfTheirPath) {
  struct Enum {
    std::string name;
    CMPIInstanceMI* mi;
    std::string className;
    std::string names, instances;
  };
  const std::vector<Enum> enums = {
      {"BlueLight", light_, "KESTA_BlueLight", "PPPD", "IIID"},
      {"BlueLightCapabilities", caps_, "KESTA_BlueLightCapabilities", "PD", "ID"},
      {"BlueLightElementCapabilities", ecInstances_, kEcClass, "PPPD", "IIID"},
      {"BlueLightSystemDevice", sdInstances_, kSdClass, "PPPPPPPPPD", "IIIIIID"}};
  for (const Enum& e : enums) {
    ObjectPathValue base = e.className == "KESTA_BlueLight" ? lightRef_ : classPath(e.className);
    for (Spoil spoil : kSpoils) {
      SCOPED_TRACE(e.name + " enumerations with " + spoilName(spoil));
      const ObjectPathValue ref = spoilt(base, spoil);
      const std::string& nameSpace = ref.nameSpace();
      const Outcome names = cmpihost::enumerateInstanceNames(broker_, e.mi, ref);
      expectSane(names);
      EXPECT_EQ(names.status, StatusValue(CMPI_RC_OK));
      EXPECT_EQ(codes(names), e.names);
      for (const ObjectPathValue& path : names.paths()) EXPECT_EQ(path.nameSpace(), nameSpace);
      const Outcome instances = cmpihost::enumerateInstances(broker_, e.mi, ref);
      expectSane(instances);
      EXPECT_EQ(instances.status, StatusValue(CMPI_RC_OK));
      EXPECT_EQ(codes(instances), e.instances);
    }
  }
}

TEST_F(HostileInputTest, GetInstanceWithSpoiltPaths) {
  struct Get {
    std::string name;
    CMPIInstanceMI* mi;
    ObjectPathValue cop;
    std::string component;
  };
  const std::vector<ObjectPathValue> ecNames =
      cmpihost::enumerateInstanceNames(broker_, ecInstances_, classPath(kEcClass)).paths();
  const std::vector<ObjectPathValue> sdNames =
      cmpihost::enumerateInstanceNames(broker_, sdInstances_, classPath(kSdClass)).paths();
  ASSERT_EQ(ecNames.size(), 3u);
  ASSERT_EQ(sdNames.size(), 9u);
  const std::vector<Get> gets = {
      {"BlueLight", light_, lightRef_, "BlueLightProfileProvider"},
      {"BlueLightCapabilities", caps_, capsRef_, "BlueLightCapabilitiesProvider"},
      {"BlueLightElementCapabilities", ecInstances_, ecNames[1],
       "BlueLightElementCapabilitiesProvider"},
      {"BlueLightSystemDevice", sdInstances_, sdNames[1], "BlueLightSystemDeviceProvider"}};
  for (const Get& g : gets) {
    const bool keyed = g.name == "BlueLight" || g.name == "BlueLightCapabilities";
    // The path as it is finds its instance.
    EXPECT_EQ(codes(cmpihost::getInstance(broker_, g.mi, g.cop)), "ID") << g.name;
    for (Spoil spoil : kSpoils) {
      SCOPED_TRACE(g.name + " GetInstance with " + spoilName(spoil));
      const Outcome outcome = cmpihost::getInstance(broker_, g.mi, spoilt(g.cop, spoil));
      expectSane(outcome);
      switch (spoil) {
        case Spoil::NoKeys:
          EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_ERR_FAILED, kNoKeyText));
          EXPECT_EQ(traces(outcome),
                    (std::vector<std::string>{"2 " + g.component + ": " + kNoKeyText}));
          EXPECT_EQ(codes(outcome), "D");
          break;
        case Spoil::UnknownClass:
          // A key that names the object is enough for the keyed lookups; the association
          // providers compare whole paths, class included.
          EXPECT_EQ(outcome.status.rc, CMPI_RC_OK);
          EXPECT_EQ(codes(outcome), keyed ? "ID" : "D");
          break;
        case Spoil::OtherNameSpace:
          EXPECT_EQ(outcome.status.rc, CMPI_RC_OK);
          if (keyed) {
            EXPECT_EQ(codes(outcome), "ID");
            for (const InstanceValue& instance : outcome.instances()) {
              EXPECT_EQ(instance.path().nameSpace(), kOtherNameSpace);
            }
          }
          break;
        case Spoil::WrongKeyType:
        case Spoil::NullKeys:
          // Counts as a missing key; nothing matches, and that is not an error.
          EXPECT_EQ(outcome.status.rc, CMPI_RC_OK);
          EXPECT_EQ(codes(outcome), "D");
          break;
      }
    }
  }
}

struct AssocOperation {
  std::string name;
  bool elementCaps;
  std::string kind;  // Associators, AssociatorNames, References, ReferenceNames
  ObjectPathValue HostileInputTest::*source;
  std::string expectedCodes;
};

Outcome runAssoc(HostileInputTest& t, CMPIAssociationMI* mi, const std::string& kind,
                 const ObjectPathValue& ref, const OptionalText& assocClass,
                 const OptionalText& resultClass, const OptionalText& role) {
  if (kind == "Associators")
    return cmpihost::associators(t.broker_, mi, ref, assocClass, resultClass, role, role);
  if (kind == "AssociatorNames") {
    return cmpihost::associatorNames(t.broker_, mi, ref, assocClass, resultClass, role, role);
  }
  if (kind == "References") return cmpihost::references(t.broker_, mi, ref, resultClass, role);
  return cmpihost::referenceNames(t.broker_, mi, ref, resultClass, role);
}

const std::vector<AssocOperation>& assocOperations() {
  static const std::vector<AssocOperation> ops = {
      {"EC Associators from a light", true, "Associators", &HostileInputTest::lightRef_, "I"},
      {"EC Associators from the capabilities", true, "Associators", &HostileInputTest::capsRef_,
       "III"},
      {"EC AssociatorNames from a light", true, "AssociatorNames", &HostileInputTest::lightRef_,
       "P"},
      {"EC AssociatorNames from the capabilities", true, "AssociatorNames",
       &HostileInputTest::capsRef_, "PPP"},
      {"EC References from a light", true, "References", &HostileInputTest::lightRef_, "I"},
      {"EC References from the capabilities", true, "References", &HostileInputTest::capsRef_,
       "III"},
      {"EC ReferenceNames from a light", true, "ReferenceNames", &HostileInputTest::lightRef_, "P"},
      {"EC ReferenceNames from the capabilities", true, "ReferenceNames",
       &HostileInputTest::capsRef_, "PPP"},
      {"SD Associators from a computer system", false, "Associators", &HostileInputTest::csRef_,
       "III"},
      {"SD Associators from a light", false, "Associators", &HostileInputTest::lightRef_, "II"},
      {"SD AssociatorNames from a computer system", false, "AssociatorNames",
       &HostileInputTest::csRef_, "PPP"},
      {"SD AssociatorNames from a light", false, "AssociatorNames", &HostileInputTest::lightRef_,
       "PP"},
      {"SD References from a computer system", false, "References", &HostileInputTest::csRef_,
       "III"},
      {"SD References from a light", false, "References", &HostileInputTest::lightRef_, "II"},
      {"SD ReferenceNames from a computer system", false, "ReferenceNames",
       &HostileInputTest::csRef_, "PPP"},
      {"SD ReferenceNames from a light", false, "ReferenceNames", &HostileInputTest::lightRef_,
       "PP"},
  };
  return ops;
}

TEST_F(HostileInputTest, AssociationOperationsWithSpoiltPaths) {
  for (const AssocOperation& op : assocOperations()) {
    CMPIAssociationMI* mi = op.elementCaps ? ec_ : sd_;
    const std::string assocClass = op.elementCaps ? kEcClass : kSdClass;
    const std::string component =
        op.elementCaps ? "BlueLightElementCapabilitiesProvider" : "BlueLightSystemDeviceProvider";
    const ObjectPathValue& source = this->*op.source;
    EXPECT_EQ(codes(runAssoc(*this, mi, op.kind, source, assocClass, std::nullopt, std::nullopt)),
              op.expectedCodes)
        << op.name;
    for (Spoil spoil : kSpoils) {
      SCOPED_TRACE(op.name + " with " + spoilName(spoil));
      const Outcome outcome = runAssoc(*this, mi, op.kind, spoilt(source, spoil), assocClass,
                                       std::nullopt, std::nullopt);
      expectSane(outcome);
      EXPECT_EQ(outcome.doneCount, 0u);
      if (spoil == Spoil::UnknownClass) {
        // No far end for a class the provider does not serve.
        const bool silent =
            !op.elementCaps && (op.kind == "Associators" || op.kind == "AssociatorNames");
        const std::string text =
            "Object Path is NULL in " +
            std::string(op.kind == "AssociatorNames" ? "AssociatorsNames" : op.kind) + ".";
        EXPECT_EQ(outcome.status,
                  silent ? StatusValue(CMPI_RC_OK) : StatusValue(CMPI_RC_ERR_FAILED, text));
        EXPECT_EQ(codes(outcome), "");
        if (!silent) {
          ASSERT_FALSE(traces(outcome).empty());
          EXPECT_EQ(traces(outcome).back(),
                    std::string("2 ").append(component).append(": ") + text);
        }
      } else {
        // The class of the source decides; its keys and namespace are only carried along.
        EXPECT_EQ(outcome.status.rc, CMPI_RC_OK) << outcome.status;
        EXPECT_EQ(codes(outcome), op.expectedCodes);
        if (spoil == Spoil::OtherNameSpace && op.kind == "AssociatorNames") {
          for (const ObjectPathValue& path : outcome.paths()) {
            if (path.className() != "KESTA_ComputerSystem") {
              EXPECT_EQ(path.nameSpace(), kOtherNameSpace);
            }
          }
        }
      }
    }
  }
}

TEST_F(HostileInputTest, NullAssociationResultAndRoleArguments) {
  for (const AssocOperation& op : assocOperations()) {
    SCOPED_TRACE(op.name);
    CMPIAssociationMI* mi = op.elementCaps ? ec_ : sd_;
    const ObjectPathValue& source = this->*op.source;
    clearLog();
    // A null association class stands for the provider's own association; null result
    // classes and roles restrict nothing.
    const Outcome outcome =
        runAssoc(*this, mi, op.kind, source, std::nullopt, std::nullopt, std::nullopt);
    expectSane(outcome);
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(codes(outcome), op.expectedCodes);
    if (op.kind == "Associators" || op.kind == "AssociatorNames") {
      // The entry line shows the argument as it came: the list stops after the null text.
      const std::string category = op.elementCaps ? "Varnel.BlueLightElementCapabilitiesProvider"
                                                  : "Varnel.BlueLightSystemDeviceProvider";
      const std::vector<std::string> lines = log(category, "LOG");
      ASSERT_FALSE(lines.empty());
      const std::string ending = " _RefLeftClass=";
      EXPECT_EQ(lines.front().substr(lines.front().size() - ending.size()), ending)
          << lines.front();
    }
    // A result class that names another class filters nothing in References; in the
    // system-device associators it ends the operation without results.
    const Outcome other = runAssoc(*this, mi, op.kind, source, op.elementCaps ? kEcClass : kSdClass,
                                   std::string("ACME_Other"), std::string(""));
    expectSane(other);
    EXPECT_EQ(other.status.rc, CMPI_RC_OK);
    if (op.kind == "References" || op.kind == "ReferenceNames") {
      EXPECT_EQ(codes(other), op.expectedCodes);
    } else if (!op.elementCaps) {
      EXPECT_EQ(codes(other), "");
    }
  }
}

// ---- Tree sizes --------------------------------------------------------------------------------

struct SizedOperation {
  std::string name;
  bool done;  // whether CMReturnDone follows the names
  // Whether it is run on a tree of 65,535 lights too: each such run hands over 65,535 objects
  // and takes seconds, so two operations carry that case.
  bool full;
  std::function<Outcome(HostileInputTest&)> run;
};

class TreeSizeTest : public HostileInputTest, public ::testing::WithParamInterface<unsigned> {};

TEST_P(TreeSizeTest, CountsAreTakenIn16Bits) {
  const unsigned lights = GetParam();
  testsupport::writeLightTree(tree_, lights);
  useComputerSystems({"cs1.example"});
  // The module files as many lights as the collected count taken in 16 bits: 65,536 lights are
  // none, 65,537 only the first.
  const unsigned filed = lights % 65536u;
  const bool big = lights > 1000;
  // Recording every broker call of a tree this size costs more than it tells.
  broker_.setRecording(!big);
  const std::vector<SizedOperation> ops = {
      {"BlueLight_EnumInstanceNames", true, true,
       [](HostileInputTest& t) {
         return cmpihost::enumerateInstanceNames(t.broker_, t.light_, classPath("KESTA_BlueLight"));
       }},
      {"BlueLightElementCapabilities_EnumInstanceNames", true, false,
       [](HostileInputTest& t) {
         return cmpihost::enumerateInstanceNames(t.broker_, t.ecInstances_, classPath(kEcClass));
       }},
      {"BlueLightElementCapabilities_AssociatorNames_FromCapabilities", false, true,
       [](HostileInputTest& t) {
         return cmpihost::associatorNames(t.broker_, t.ec_, t.capsRef_, kEcClass);
       }},
      {"BlueLightSystemDevice_EnumInstanceNames", true, false,
       [](HostileInputTest& t) {
         return cmpihost::enumerateInstanceNames(t.broker_, t.sdInstances_, classPath(kSdClass));
       }},
  };
  for (const SizedOperation& op : ops) {
    if (lights == 65535u && !op.full) continue;
    SCOPED_TRACE(op.name + " with " + std::to_string(lights) + " lights");
    const auto started = std::chrono::steady_clock::now();
    const Outcome outcome = op.run(*this);
    const double seconds =
        std::chrono::duration<double>(std::chrono::steady_clock::now() - started).count();
    RecordProperty(op.name, std::to_string(seconds));
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    const std::vector<ObjectPathValue> paths = outcome.paths();
    EXPECT_EQ(paths.size(), filed);
    EXPECT_EQ(outcome.count(ResultKind::ObjectPath), filed);
    // An empty light map ends the names without CMReturnDone.
    EXPECT_EQ(outcome.doneCount, (filed != 0 && op.done) ? 1u : 0u);
    if (!big && filed == 0) {
      std::vector<std::string> expected;
      if (op.name.find("AssociatorNames") != std::string::npos) {
        expected.emplace_back(
            "1 BlueLightElementCapabilitiesProvider: Target Class is BlueLightClass");
      }
      expected.emplace_back("1 BlueLightProfileProvider: ***No instance found***");
      EXPECT_EQ(traces(outcome), expected);
    }
    if (filed == 1) {
      // The first light of the tree, whatever follows it.
      const ObjectPathValue& path = paths.at(0);
      const Value* light = path.findKey(op.name.rfind("BlueLight_", 0) == 0 ||
                                                op.name.find("AssociatorNames") != std::string::npos
                                            ? "DeviceID"
                                            : "PartComponent");
      if (light == nullptr) light = path.findKey("ManagedElement");
      ASSERT_NE(light, nullptr) << path;
      const std::string text = light->toString();
      EXPECT_NE(text.find("Blue Light:1.1"), std::string::npos) << text;
      EXPECT_EQ(text.find("Blue Light:1.1"), text.rfind("Blue Light:1.1")) << text;
    }
  }
  broker_.setRecording(true);
}

INSTANTIATE_TEST_SUITE_P(Lights, TreeSizeTest, ::testing::Values(0u, 1u, 65535u, 65536u, 65537u),
                         [](const ::testing::TestParamInfo<unsigned>& info) {
                           return "Lights" + std::to_string(info.param);
                         });

// ---- Source lists ------------------------------------------------------------------------------

// Lists of sources as a careless configuration writes them: every operation still answers with
// the lights of the sources that can be read, the list's own problems cost one line each, and
// nothing crashes however long or odd the list.
TEST_F(HostileInputTest, HostileSourceListsStillGiveTheTreesLights) {
  const std::string tree = "file:" + tree_;
  std::string thousand;
  for (int i = 0; i < 1000; ++i) thousand += ";file:" + dir_.file("missing-" + std::to_string(i));
  struct Case {
    std::string name;
    std::string list;
    std::size_t lights;
    std::size_t lines;  // lines of the instrumentation's category per operation
  };
  const std::vector<Case> cases = {
      {"the tree and a thousand missing files", tree + thousand, 3, 1 + 63},
      {"nothing but semicolons", std::string(500, ';'), 0, 1},
      {"the tree between empty entries", ";;" + tree + ";;", 3, 1},
      {"the tree three times", tree + ";" + tree + " ; " + tree, 3, 1},
      {"an entry of ten thousand characters", tree + ";file:/" + std::string(10000, 'x'), 3, 1},
      {"control characters and invalid UTF-8", tree + ";file:/a\x01\xff\n;bogus\t:", 3, 2},
      {"auto twice with nothing to find", "auto;auto;" + tree, 3, 1}};
  testsupport::ScopedEnv root("KESTA_DISCOVERY_ROOT", dir_.file("empty-machine"));
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    testsupport::ScopedEnv source("KESTA_INSTRUMENTATION", c.list);
    clearLog();
    const Outcome names =
        cmpihost::enumerateInstanceNames(broker_, light_, classPath("KESTA_BlueLight"));
    expectSane(names);
    EXPECT_EQ(names.paths().size(), c.lights);
    std::size_t lines = 0;
    for (const testsupport::LogLine& line : logLines()) {
      if (line.category != "Kesta.Platform.Instrumentation") continue;
      ++lines;
      EXPECT_EQ(line.text.find('\n'), std::string::npos) << line.text;
    }
    EXPECT_EQ(lines, c.lines);
    const Outcome instances =
        cmpihost::enumerateInstances(broker_, light_, classPath("KESTA_BlueLight"));
    expectSane(instances);
    EXPECT_EQ(instances.instances().size(), c.lights);
  }
}

// ---- Descriptions ------------------------------------------------------------------------------

TEST_F(HostileInputTest, AnEmptyDescriptionEndsTheWalkAndFilesNothing) {
  for (const std::vector<testsupport::Node>& tree :
       {std::vector<testsupport::Node>{testsupport::blueLight("1.1", 1u, 2u, "")},
        std::vector<testsupport::Node>{testsupport::blueLight("1.1"),
                                       testsupport::blueLight("1.2", 1u, 2u, ""),
                                       testsupport::blueLight("1.3")}}) {
    useTree(tree);
    const Outcome names =
        cmpihost::enumerateInstanceNames(broker_, light_, classPath("KESTA_BlueLight"));
    EXPECT_EQ(names.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(codes(names), "");
    EXPECT_EQ(traces(names),
              (std::vector<std::string>{"1 BlueLightProfileProvider: ***No instance found***"}));
    const Outcome instances =
        cmpihost::enumerateInstances(broker_, light_, classPath("KESTA_BlueLight"));
    EXPECT_EQ(instances.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(codes(instances), "D");
  }
}

TEST_F(HostileInputTest, LongDescriptionsAndPrintfDirectivesComeBackAsTheyAre) {
  const std::vector<std::string> descriptions = {std::string(511, 'a'),
                                                 std::string(512, 'b'),
                                                 std::string(5000, 'c'),
                                                 "%s%n",
                                                 "%s%n%s%n%x%p%d" + std::string(600, '%'),
                                                 "Blue %n Light %s"};
  for (const std::string& description : descriptions) {
    SCOPED_TRACE("a description of " + std::to_string(description.size()) + " characters");
    useTree({testsupport::blueLight("1.1", 1u, 2u, description)});
    clearLog();
    const Outcome instances =
        cmpihost::enumerateInstances(broker_, light_, classPath("KESTA_BlueLight"));
    expectSane(instances);
    EXPECT_EQ(instances.status, StatusValue(CMPI_RC_OK));
    ASSERT_EQ(instances.instances().size(), 1u);
    const InstanceValue instance = instances.instances()[0];
    const std::string deviceID = description + ":1.1";
    EXPECT_EQ(instance.find("DeviceID")->toString(), Value(deviceID).toString());
    for (const char* name : {"Description", "Name", "ElementName"}) {
      EXPECT_EQ(instance.find(name)->toString(), Value(description).toString()) << name;
    }
    const Outcome one = cmpihost::getInstance(broker_, light_, lightPath(deviceID));
    EXPECT_EQ(codes(one), "ID");
    // Every line the module writes fits its 512-byte buffer.
    for (const testsupport::LogLine& line : logLines()) {
      EXPECT_LE(line.text.size(), 511u) << line.category;
    }
  }
}

TEST_F(HostileInputTest, LongAndPrintfArgumentsAreCutAtTheTraceBuffer) {
  for (const std::string& text :
       {std::string(5000, 'r'), "%s%n" + std::string(700, 'x'), std::string("%s%n%s%n")}) {
    SCOPED_TRACE("arguments of " + std::to_string(text.size()) + " characters");
    clearLog();
    const Outcome outcome =
        cmpihost::associators(broker_, ec_, capsRef_, kEcClass, text, text, text);
    expectSane(outcome);
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    // The result class filters nothing here: every light comes back.
    EXPECT_EQ(codes(outcome), "III");
    const std::vector<std::string> lines =
        log("Varnel.BlueLightElementCapabilitiesProvider", "LOG");
    ASSERT_FALSE(lines.empty());
    const std::string& entry = lines.front();
    const std::string prefix =
        "ENTERING: BlueLightElementCapabilities_Associators() in "
        "BlueLightElementCapabilitiesProvider.cpp [Line: N],Parameters List:  mi=PTR ctx=PTR "
        "result=PTR ref=PTR _RefLeftClass=" +
        kEcClass + " _RefRightClass=";
    EXPECT_EQ(entry.substr(0, prefix.size()), prefix);
    EXPECT_NE(entry.find(text.substr(0, 4)), std::string::npos) << "directives are text";
    for (const testsupport::LogLine& line : logLines()) {
      EXPECT_LE(line.text.size(), 511u) << line.category;
    }
    if (text.size() > 600) {
      // Cut to 511 characters, the buffer's last byte being the terminator.
      const std::vector<testsupport::LogLine> raw = logLines();
      bool cut = false;
      for (const testsupport::LogLine& line : raw) {
        cut =
            cut || (line.text.rfind("ENTERING: BlueLightElementCapabilities_Associators", 0) == 0 &&
                    line.text.size() == 511u);
      }
      EXPECT_TRUE(cut);
    }
  }
}

// ---- A tree file rewritten while it is read ----------------------------------------------------

std::vector<testsupport::Node> treeA() {
  return {testsupport::blueLight("1.1"), testsupport::blueLight("1.2")};
}

std::vector<testsupport::Node> treeB() {
  return {testsupport::blueLight("2.1", 20u, 1u, "Blue Light Front"),
          testsupport::blueLight("2.2", 22u, 3u, "Blue Light Rear"),
          testsupport::blueLight("2.3", 1u, 2u, "Blue Light Rack")};
}

class RewrittenTreeTest : public HostileInputTest, public ::testing::WithParamInterface<bool> {};

TEST_P(RewrittenTreeTest, OperationsSurviveATreeReplacedUnderThem) {
  const bool atomic = GetParam();
  const std::string a = testsupport::treeJson(treeA());
  const std::string b = testsupport::treeJson(treeB());
  const std::set<std::string> known = {"Blue Light:1.1", "Blue Light:1.2", "Blue Light Front:2.1",
                                       "Blue Light Rear:2.2", "Blue Light Rack:2.3"};
  testsupport::writeFile(tree_, a);
  broker_.setRecording(false);

  std::atomic<bool> stop{false};
  std::atomic<unsigned long> rewrites{0};
  const std::string file = tree_;
  std::thread writer([&] {
    bool useA = false;
    while (!stop.load()) {
      const std::string& text = useA ? a : b;
      useA = !useA;
      if (atomic) {
        const std::string temporary = file + ".new";
        testsupport::writeFile(temporary, text);
        std::rename(temporary.c_str(), file.c_str());
      } else {
        // Truncated, then written in two pieces: readers see empty and half-written files.
        std::ofstream out(file, std::ios::binary | std::ios::trunc);
        out << text.substr(0, text.size() / 2) << std::flush;
        std::this_thread::yield();
        out << text.substr(text.size() / 2);
      }
      ++rewrites;
    }
  });

  unsigned runs = 0, empty = 0;
  const auto until = std::chrono::steady_clock::now() + std::chrono::milliseconds(1500);
  while (std::chrono::steady_clock::now() < until) {
    const std::vector<Outcome> outcomes = {
        cmpihost::enumerateInstanceNames(broker_, light_, classPath("KESTA_BlueLight")),
        cmpihost::enumerateInstances(broker_, light_, classPath("KESTA_BlueLight")),
        cmpihost::enumerateInstances(broker_, ecInstances_, classPath(kEcClass)),
        cmpihost::associatorNames(broker_, sd_, csRef_, kSdClass)};
    for (const Outcome& outcome : outcomes) {
      ++runs;
      expectSane(outcome);
      EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
      std::size_t lightsSeen = 0;
      for (const ObjectPathValue& path : outcome.paths()) {
        if (const Value* id = path.findKey("DeviceID")) {
          EXPECT_EQ(known.count(id->asString()), 1u) << id->asString();
          ++lightsSeen;
        }
      }
      for (const InstanceValue& instance : outcome.instances()) {
        if (const Value* id = instance.find("DeviceID")) {
          EXPECT_EQ(known.count(id->asString()), 1u) << id->asString();
          ++lightsSeen;
        }
      }
      empty += outcome.paths().empty() && outcome.instances().empty() ? 1 : 0;
    }
  }
  stop = true;
  writer.join();
  broker_.setRecording(true);
  std::cout << "[hostile input] " << (atomic ? "atomic" : "non-atomic")
            << " rewrites: " << rewrites.load() << ", operations: " << runs
            << ", empty answers: " << empty << std::endl;
  EXPECT_GT(runs, 0u);
  EXPECT_GT(rewrites.load(), 0u);
}

INSTANTIATE_TEST_SUITE_P(Rewrites, RewrittenTreeTest, ::testing::Values(true, false),
                         [](const ::testing::TestParamInfo<bool>& info) {
                           return info.param ? std::string("Atomic") : std::string("NonAtomic");
                         });

}  // namespace
