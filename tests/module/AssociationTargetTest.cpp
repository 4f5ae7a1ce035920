// The far end of an association, chosen from the class of the source path and the association.
#include "FactoryFixture.h"

namespace factorytest {
namespace {

using cmpihost::ObjectPathValue;
using Names = std::vector<std::string>;

struct Row {
  const char* source;
  const char* association;
  const char* target;     // null: not served
  const char* component;  // of the broker trace
  const char* text;
};

const Row kRows[] = {
    {"KESTA_ComputerSystem", "KESTA_BlueLightSystemDevice", "KESTA_BlueLight",
     "BlueLightSystemDeviceProvider", "Target Class is BlueLightClass"},
    {"KESTA_BlueLight", "KESTA_BlueLightSystemDevice", "KESTA_ComputerSystem",
     "BlueLightSystemDeviceProvider", "Target Class is ComputerSystemClass"},
    {"KESTA_BlueLight", "KESTA_BlueLightElementCapabilities", "KESTA_BlueLightCapabilities",
     "BlueLightElementCapabilitiesProvider", "Target Class is BlueLightCapabilitiesClass"},
    {"KESTA_BlueLightCapabilities", "KESTA_BlueLightElementCapabilities", "KESTA_BlueLight",
     "BlueLightElementCapabilitiesProvider", "Target Class is BlueLightClass"},
    {"KESTA_BlueLightCapabilities", "KESTA_BlueLightSystemDevice", nullptr, nullptr, nullptr},
    {"KESTA_ComputerSystem", "KESTA_BlueLightElementCapabilities", nullptr, nullptr, nullptr},
    {"CIM_ComputerSystem", "KESTA_BlueLightSystemDevice", nullptr, nullptr, nullptr},
    {"kesta_bluelight", "KESTA_BlueLightSystemDevice", nullptr, nullptr, nullptr},
    {"KESTA_BlueLight", "kesta_bluelightsystemdevice", nullptr, nullptr, nullptr},
    {"KESTA_BlueLight", "CIM_SystemDevice", nullptr, nullptr, nullptr},
    {"KESTA_BlueLightSystemDevice", "KESTA_BlueLightSystemDevice", nullptr, nullptr, nullptr},
};

std::string nameList(const char* left, const char* right) {
  std::string list = " broker=PTR ref=PTR _RefLeftClass=";
  if (left == nullptr) return list;
  list += left;
  list += " _RefRightClass=";
  if (right == nullptr) return list;
  return list + right + " rc=PTR";
}

TEST_F(FactoryTest, DecisionTable) {
  BlueLightFactory factory;
  for (const Row& row : kRows) {
    log_.clear();
    broker_.clearRecords();
    CMPIStatus status = untouchedStatus();
    const char* target =
        factory.get_assoc_targetClass_Name(mb(), ref(row.source), row.association, "Any", &status);
    const std::string what = std::string(row.source) + " / " + row.association;
    if (row.target == nullptr) {
      EXPECT_EQ(target, nullptr) << what;
      EXPECT_TRUE(brokerTraces().empty()) << what;
      EXPECT_EQ(factoryLog(),
                (Names{entering("get_assoc_targetClass_Name", nameList(row.association, "Any"))}))
          << what;
      continue;
    }
    ASSERT_NE(target, nullptr) << what;
    EXPECT_STREQ(target, row.target) << what;
    EXPECT_EQ(brokerTraces(),
              (std::vector<cmpihost::TraceRecord>{brokerTrace(1, row.component, row.text)}))
        << what;
    EXPECT_EQ(factoryLog(),
              (Names{entering("get_assoc_targetClass_Name", nameList(row.association, "Any")),
                     exiting("get_assoc_targetClass_Name", nameList(row.association, "Any"))}))
        << what;
  }
}

TEST_F(FactoryTest, TargetNameIsTheSameConstantEveryTime) {
  BlueLightFactory factory;
  const char* first = factory.get_assoc_targetClass_Name(
      mb(), ref("KESTA_BlueLight"), "KESTA_BlueLightSystemDevice", nullptr, nullptr);
  const char* second = factory.get_assoc_targetClass_Name(
      mb(), ref("KESTA_BlueLight"), "KESTA_BlueLightSystemDevice", "CIM_ComputerSystem", nullptr);
  EXPECT_EQ(first, second);
}

TEST_F(FactoryTest, ResultClassNeverDecides) {
  BlueLightFactory factory;
  for (const char* right : {"KESTA_BlueLight", "Nonsense", "", static_cast<const char*>(nullptr)}) {
    EXPECT_STREQ(
        factory.get_assoc_targetClass_Name(mb(), ref("KESTA_BlueLight"),
                                           "KESTA_BlueLightElementCapabilities", right, nullptr),
        "KESTA_BlueLightCapabilities");
  }
}

TEST_F(FactoryTest, NullResultClassEndsTheTracedList) {
  BlueLightFactory factory;
  factory.get_assoc_targetClass_Name(mb(), ref("KESTA_BlueLight"),
                                     "KESTA_BlueLightElementCapabilities", nullptr, nullptr);
  const std::string list =
      " broker=PTR ref=PTR _RefLeftClass=KESTA_BlueLightElementCapabilities "
      "_RefRightClass=";
  EXPECT_EQ(factoryLog(), (Names{entering("get_assoc_targetClass_Name", list),
                                 exiting("get_assoc_targetClass_Name", list)}));
}

TEST_F(FactoryTest, NullAssociationClassMatchesNoRow) {
  BlueLightFactory factory;
  for (const char* source :
       {"KESTA_BlueLight", "KESTA_ComputerSystem", "KESTA_BlueLightCapabilities", "Other"}) {
    log_.clear();
    EXPECT_EQ(
        factory.get_assoc_targetClass_Name(mb(), ref(source), nullptr, "KESTA_BlueLight", nullptr),
        nullptr)
        << source;
    EXPECT_EQ(
        factoryLog(),
        (Names{entering("get_assoc_targetClass_Name", " broker=PTR ref=PTR _RefLeftClass=")}));
  }
  EXPECT_TRUE(brokerTraces().empty());
}

TEST_F(FactoryTest, MissingSourcePathMatchesNoRow) {
  BlueLightFactory factory;
  EXPECT_EQ(factory.get_assoc_targetClass_Name(mb(), nullptr, "KESTA_BlueLightSystemDevice",
                                               nullptr, nullptr),
            nullptr);
  EXPECT_EQ(factory.get_assoc_targetClass_ObjectPath(mb(), nullptr, "KESTA_BlueLightSystemDevice",
                                                     nullptr, nullptr),
            nullptr);
}

TEST_F(FactoryTest, TargetObjectPathOfTheComputerSystem) {
  BlueLightFactory factory;
  cmpihost::ObjectPathValue source("root/interop", "KESTA_BlueLight");
  source.addKey("DeviceID", cmpihost::Value("Blue Light:1"));
  CMPIStatus status = untouchedStatus();
  CMPIObjectPath* path = factory.get_assoc_targetClass_ObjectPath(
      mb(), request_->objectPath(source), "KESTA_BlueLightSystemDevice", "X", &status);
  ASSERT_NE(path, nullptr);
  ObjectPathValue expected("root/interop", "KESTA_ComputerSystem");
  expected.setHost(kSystemName);
  EXPECT_EQ(snapshot(path), expected);
  EXPECT_EQ(status.rc, CMPI_RC_OK);
  const std::string list = nameList("KESTA_BlueLightSystemDevice", "X");
  EXPECT_EQ(factoryLog(), (Names{entering("get_assoc_targetClass_ObjectPath", list),
                                 entering("get_assoc_targetClass_Name", list),
                                 exiting("get_assoc_targetClass_Name", list),
                                 exiting("get_assoc_targetClass_ObjectPath", list)}));
}

TEST_F(FactoryTest, TargetObjectPathOfAnUnservedPairIsNullWithExitLine) {
  BlueLightFactory factory;
  EXPECT_EQ(factory.get_assoc_targetClass_ObjectPath(mb(), ref("CIM_ComputerSystem"),
                                                     "KESTA_BlueLightSystemDevice", "X", nullptr),
            nullptr);
  const std::string list =
      " broker=PTR ref=PTR _RefLeftClass=KESTA_BlueLightSystemDevice "
      "_RefRightClass=X rc=0";
  EXPECT_EQ(factoryLog(), (Names{entering("get_assoc_targetClass_ObjectPath", list),
                                 entering("get_assoc_targetClass_Name", list),
                                 exiting("get_assoc_targetClass_ObjectPath", list)}));
  EXPECT_TRUE(brokerTraces().empty());
}

TEST_F(FactoryTest, TargetObjectPathForEveryServedRow) {
  BlueLightFactory factory;
  for (const Row& row : kRows) {
    if (row.target == nullptr) continue;
    CMPIObjectPath* path = factory.get_assoc_targetClass_ObjectPath(
        mb(), ref(row.source), row.association, nullptr, nullptr);
    ASSERT_NE(path, nullptr) << row.source;
    EXPECT_EQ(snapshot(path).className(), row.target);
    EXPECT_TRUE(snapshot(path).keys().empty());
  }
}

TEST_F(FactoryTest, TargetObjectPathFailureIsTheBrokers) {
  BlueLightFactory factory;
  broker_.armFault(cmpihost::Fault::nullResult(cmpihost::CreatingFunction::NewObjectPath, 1));
  EXPECT_EQ(factory.get_assoc_targetClass_ObjectPath(
                mb(), ref("KESTA_BlueLight"), "KESTA_BlueLightSystemDevice", nullptr, nullptr),
            nullptr);
  // The exit line is written on both outcomes.
  EXPECT_EQ(factoryLog().size(), 4u);
}

}  // namespace
}  // namespace factorytest
