// The capabilities record: constants produced by stateful getters.
#include <gtest/gtest.h>

#include <vector>

#include "BlueLight.h"

namespace {

using Kesta::BlueLightProvider::BlueLightCapabilities;
using States = std::vector<unsigned short>;

TEST(CapabilitiesRecord, InstanceIDIsTheConstantAndIsStored) {
  BlueLightCapabilities record;
  EXPECT_EQ(record.instanceID, "");
  EXPECT_EQ(record.getInstanceID(), "KESTA:BlueLightCapabilities1");
  EXPECT_EQ(record.instanceID, "KESTA:BlueLightCapabilities1");
  EXPECT_EQ(record.getInstanceID().size(), 28u);
}

TEST(CapabilitiesRecord, InstanceIDOverwritesWhateverTheFieldHeld) {
  BlueLightCapabilities record;
  record.instanceID = "something else";
  EXPECT_EQ(record.getInstanceID(), "KESTA:BlueLightCapabilities1");
  EXPECT_EQ(record.instanceID, "KESTA:BlueLightCapabilities1");
}

TEST(CapabilitiesRecord, AlarmStatesGrowOnEveryCall) {
  BlueLightCapabilities record;
  EXPECT_TRUE(record.alarmStatesSupported.empty());
  EXPECT_EQ(record.getAlarmStatesSupported(), (States{1, 2, 3}));
  EXPECT_EQ(record.getAlarmStatesSupported(), (States{1, 2, 3, 1, 2, 3}));
  EXPECT_EQ(record.alarmStatesSupported.size(), 6u);
}

TEST(CapabilitiesRecord, CopyTakenBeforeAnyCallStartsFresh) {
  BlueLightCapabilities record;
  BlueLightCapabilities copy = record;
  record.getAlarmStatesSupported();
  record.getAlarmStatesSupported();
  EXPECT_EQ(copy.getAlarmStatesSupported(), (States{1, 2, 3}));
}

TEST(CapabilitiesRecord, ElementNameEditIsNeverSupported) {
  BlueLightCapabilities record;
  EXPECT_FALSE(record.getElementNameEditSupported());
  EXPECT_FALSE(record.elementNameEditSupported);
  record.elementNameEditSupported = true;
  EXPECT_FALSE(record.getElementNameEditSupported());
  EXPECT_FALSE(record.getElementNameEditSupported());
}

TEST(CapabilitiesRecord, SpareStatesStayEmpty) {
  BlueLightCapabilities record;
  record.getInstanceID();
  record.getAlarmStatesSupported();
  BlueLightCapabilities copy = record;
  EXPECT_TRUE(copy.spareStates.empty());
  EXPECT_EQ(copy.alarmStatesSupported, (States{1, 2, 3}));
}

}  // namespace
