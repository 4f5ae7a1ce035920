// Who an operation is sent to, and with which arguments.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "CommandLine.h"
#include "Dispatch.h"
#include "UsageError.h"

namespace bluelight::cli {
namespace {

const std::string kLight =
    "KESTA_BlueLight.CreationClassName=\"KESTA_BlueLight\",DeviceID=\"Blue Light:1.2\","
    "SystemCreationClassName=\"KESTA_ComputerSystem\",SystemName=\"host\"";

Plan plan(const std::vector<std::string>& arguments) {
  return planOperation(parseCommandLine(arguments));
}

std::vector<std::string> providersOf(const Plan& plan) {
  std::vector<std::string> names;
  names.reserve(plan.calls.size());
  for (const Plan::Call& call : plan.calls) names.emplace_back(call.provider->name);
  return names;
}

TEST(DispatchPlan, InstanceOperationsGoToTheClassProvider) {
  const std::vector<std::pair<std::string, std::string>> classes = {
      {"KESTA_BlueLight", "BlueLightProfileProvider"},
      {"KESTA_BlueLightCapabilities", "BlueLightCapabilitiesProvider"},
      {"KESTA_BlueLightElementCapabilities", "BlueLightElementCapabilitiesProvider"},
      {"KESTA_BlueLightSystemDevice", "BlueLightSystemDeviceProvider"},
  };
  for (const auto& [className, provider] : classes) {
    for (const char* operation : {"ei", "ein"}) {
      const Plan p = plan({operation, className});
      EXPECT_EQ(providersOf(p), std::vector<std::string>{provider}) << className;
      EXPECT_EQ(p.calls[0].kind, MIKind::Instance);
      EXPECT_EQ(p.target.nameSpace(), "root/cimv2");
      EXPECT_TRUE(p.target.keys().empty());
    }
  }
}

TEST(DispatchPlan, ClassNamesAreSentInTheirDeclaredSpelling) {
  const Plan enumeration = plan({"ei", "interop:kesta_bluelight"});
  EXPECT_EQ(enumeration.target.className(), "KESTA_BlueLight");
  EXPECT_EQ(enumeration.target.nameSpace(), "interop");

  const Plan walk = plan({"ai", "kesta_computersystem.Name=\"h\"", "--assoc-class",
                          "kesta_bluelightsystemdevice", "--result-class", "kesta_bluelight"});
  EXPECT_EQ(walk.target.className(), "KESTA_ComputerSystem");
  EXPECT_EQ(walk.assocClass, "KESTA_BlueLightSystemDevice");
  EXPECT_EQ(walk.resultClass, "KESTA_BlueLight");

  const Plan nested = plan(
      {"gi",
       R"(kesta_bluelightelementcapabilities.ManagedElement="kesta_bluelight.DeviceID=\"x\"")"});
  EXPECT_EQ(nested.target.className(), "KESTA_BlueLightElementCapabilities");
  EXPECT_EQ(nested.target.findKey("ManagedElement")->asReference().className(), "KESTA_BlueLight");
}

TEST(DispatchPlan, UnknownNamesAreLeftAlone) {
  const Plan p = plan({"ain", kLight, "--result-class", "CIM_ComputerSystem"});
  EXPECT_EQ(p.resultClass, "CIM_ComputerSystem");
}

TEST(DispatchPlan, GetInstanceTakesThePathAndItsProperties) {
  const Plan p = plan({"gi", kLight, "--properties", "AlarmState", "--namespace", "root/kesta"});
  EXPECT_EQ(providersOf(p), std::vector<std::string>{"BlueLightProfileProvider"});
  EXPECT_EQ(p.target.nameSpace(), "root/kesta");
  EXPECT_EQ(p.target.keys().size(), 4u);
  EXPECT_EQ(p.properties, (std::vector<std::string>{"AlarmState"}));
}

TEST(DispatchPlan, NoProviderForTheClass) {
  try {
    plan({"gi", "KESTA_ComputerSystem.CreationClassName=\"KESTA_ComputerSystem\",Name=\"h\""});
    FAIL() << "no error";
  } catch (const NoProviderError& error) {
    EXPECT_STREQ(error.what(), "no provider serves class KESTA_ComputerSystem");
  }
  EXPECT_THROW(plan({"ei", "CIM_AlarmDevice"}), NoProviderError);
}

TEST(DispatchPlan, EnumerationsTakeClassNamesOnly) {
  EXPECT_THROW(plan({"ei", kLight}), UsageError);
  EXPECT_THROW(plan({"ein", "KESTA_BlueLight.x"}), UsageError);
}

TEST(DispatchPlan, AssociationWithoutClassAsksEveryAssociationProvider) {
  for (const char* operation : {"ai", "ain", "ri", "rin"}) {
    const Plan p = plan({operation, kLight});
    EXPECT_EQ(providersOf(p), (std::vector<std::string>{"BlueLightElementCapabilitiesProvider",
                                                        "BlueLightSystemDeviceProvider"}))
        << operation;
    EXPECT_TRUE(p.severalAsked);
    EXPECT_FALSE(p.assocClass.has_value());
    EXPECT_FALSE(p.resultClass.has_value());
    for (const Plan::Call& call : p.calls) EXPECT_EQ(call.kind, MIKind::Association);
  }
}

TEST(DispatchPlan, NamedAssociationAsksOnlyItsProvider) {
  const Plan associators = plan({"ain", kLight, "--assoc-class", "KESTA_BlueLightSystemDevice"});
  EXPECT_EQ(providersOf(associators), std::vector<std::string>{"BlueLightSystemDeviceProvider"});
  EXPECT_FALSE(associators.severalAsked);
  EXPECT_EQ(associators.assocClass, "KESTA_BlueLightSystemDevice");

  const Plan references =
      plan({"rin", kLight, "--result-class", "KESTA_BlueLightElementCapabilities"});
  EXPECT_EQ(providersOf(references),
            std::vector<std::string>{"BlueLightElementCapabilitiesProvider"});
  EXPECT_EQ(references.resultClass, "KESTA_BlueLightElementCapabilities");
  EXPECT_FALSE(references.assocClass.has_value());

  // The result class of Associators filters the far end; it does not pick a provider.
  const Plan filtered = plan({"ai", kLight, "--result-class", "KESTA_BlueLightCapabilities"});
  EXPECT_EQ(filtered.calls.size(), 2u);
}

TEST(DispatchPlan, AssociationClassThatNoProviderServes) {
  try {
    plan({"ai", kLight, "--assoc-class", "CIM_SystemDevice"});
    FAIL() << "no error";
  } catch (const NoProviderError& error) {
    EXPECT_STREQ(error.what(), "no provider serves association class CIM_SystemDevice");
  }
  // The instance classes have no association MI.
  EXPECT_THROW(plan({"ri", kLight, "--assoc-class", "KESTA_BlueLight"}), NoProviderError);
}

TEST(DispatchPlan, DescribesCalls) {
  const Plan p = plan({"ai", kLight, "--role", "PartComponent", "--properties", "A,B"});
  EXPECT_EQ(describeCall(p, p.calls[1]),
            "BlueLightSystemDeviceProvider.associators(root/cimv2:KESTA_BlueLight."
            "CreationClassName=\"KESTA_BlueLight\",DeviceID=\"Blue Light:1.2\","
            "SystemCreationClassName=\"KESTA_ComputerSystem\",SystemName=\"host\", "
            "assocClass=NULL, resultClass=NULL, role=\"PartComponent\", resultRole=NULL, "
            "properties={A, B})");
  const Plan e = plan({"ein", "KESTA_BlueLight"});
  EXPECT_EQ(describeCall(e, e.calls[0]),
            "BlueLightProfileProvider.enumerateInstanceNames(root/cimv2:KESTA_BlueLight)");
  const Plan g = plan({"gi", "KESTA_BlueLight.DeviceID=\"x\"", "--properties", ""});
  EXPECT_EQ(describeCall(g, g.calls[0]),
            "BlueLightProfileProvider.getInstance(root/cimv2:KESTA_BlueLight.DeviceID=\"x\", "
            "properties={})");
  const Plan r = plan({"rin", kLight, "--assoc-class", "KESTA_BlueLightSystemDevice"});
  EXPECT_EQ(describeCall(r, r.calls[0]).substr(0, 45),
            "BlueLightSystemDeviceProvider.referenceNames(");
  EXPECT_NE(
      describeCall(r, r.calls[0]).find(", resultClass=\"KESTA_BlueLightSystemDevice\", role=NULL)"),
      std::string::npos);
}

}  // namespace
}  // namespace bluelight::cli
