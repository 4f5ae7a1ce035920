// The data that drives the association frame: which end a class names, and which result classes
// admit an end.
#include <gtest/gtest.h>

#include <string>

#include "AssociationFrame.h"

namespace {

using Kesta::BlueLightProvider::Association;
using Kesta::BlueLightProvider::AssociationEnd;
using Kesta::BlueLightProvider::EndSource;

const AssociationEnd kSystems = {"KESTA_ComputerSystem", "GroupComponent",
                                 EndSource::ComputerSystems, "KESTA_ComputerSystem",
                                 "CIM_ComputerSystem"};
const AssociationEnd kLights = {"KESTA_BlueLight", "PartComponent", EndSource::Lights,
                                "KESTA_BlueLight", "CIM_AlarmDevice"};
const AssociationEnd kCapabilities = {"KESTA_BlueLightCapabilities", "Capabilities",
                                      EndSource::Capabilities, nullptr, nullptr};

TEST(AssociationEnd, ResultClassesAdmitInAnyLetterCase) {
  EXPECT_TRUE(kLights.admits("KESTA_BlueLight"));
  EXPECT_TRUE(kLights.admits("kesta_BLUELIGHT"));
  EXPECT_TRUE(kLights.admits("CIM_AlarmDevice"));
  EXPECT_TRUE(kLights.admits("cim_alarmdevice"));
  EXPECT_TRUE(kSystems.admits("cim_computersystem"));
}

TEST(AssociationEnd, OtherResultClassesDoNotAdmit) {
  EXPECT_FALSE(kLights.admits("CIM_ComputerSystem"));
  EXPECT_FALSE(kLights.admits("KESTA_BlueLights"));
  EXPECT_FALSE(kLights.admits(""));
  EXPECT_FALSE(kSystems.admits("CIM_AlarmDevice"));
}

TEST(AssociationEnd, LettersAreFoldedAsAscii) {
  // "I" is the capital of "i" as CIM names are spelt, whatever letters a locale pairs; and a
  // dotted capital I (in UTF-8) is no spelling of "i".
  EXPECT_TRUE(kLights.admits("KESTA_BLUELIGHT"));
  EXPECT_TRUE(kLights.admits("CIM_ALARMDEVICE"));
  EXPECT_FALSE(kLights.admits("KESTA_BLUEL\xC4\xB0GHT"));
}

TEST(AssociationEnd, NullResultClassOrNoneToCheckAdmits) {
  EXPECT_TRUE(kLights.admits(nullptr));
  EXPECT_TRUE(kCapabilities.admits("Anything_At_All"));
  EXPECT_TRUE(kCapabilities.admits(nullptr));
}

TEST(Association, EndOfClassIsExact) {
  const std::string logger = "Varnel.Test";
  const Association association = {
      "KESTA_Test", "TestProvider", logger,  "Test.cpp",
      false,        kSystems,       kLights, {"GroupComponent", "PartComponent"},
      nullptr,      nullptr,        false,   " properties="};
  EXPECT_EQ(association.endOfClass("KESTA_ComputerSystem"), &association.first);
  EXPECT_EQ(association.endOfClass("KESTA_BlueLight"), &association.second);
  EXPECT_EQ(association.endOfClass("kesta_bluelight"), nullptr);
  EXPECT_EQ(association.endOfClass("CIM_ComputerSystem"), nullptr);
  EXPECT_EQ(association.endOfClass(nullptr), nullptr);
}

}  // namespace
