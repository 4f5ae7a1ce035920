// The light record: defaults, setters and the translation of node status codes.
#include <gtest/gtest.h>

#include <vector>

#include "BlueLight.h"

namespace {

using Kesta::BlueLightProvider::BlueLight;
using Status = std::vector<unsigned short>;

TEST(BlueLightRecord, DefaultRecord) {
  BlueLight light;
  EXPECT_EQ(light.deviceID, "");
  EXPECT_EQ(light.elementName, "");
  EXPECT_TRUE(light.getOperationalStatus().empty());
  EXPECT_EQ(light.getRequestedState(), 0);
  EXPECT_EQ(light.getHealthState(), 0);
  EXPECT_EQ(light.getAlarmState(), 0);
  EXPECT_FALSE(light.getAudibleAlarm());
  EXPECT_FALSE(light.getVisibleAlarm());
  EXPECT_FALSE(light.getMotionAlarm());
}

TEST(BlueLightRecord, OperationalStatusTable) {
  struct Row {
    unsigned status;
    Status expected;
  };
  const Row rows[] = {{1, {2, 11}}, {20, {3, 5}}, {21, {3}},         {25, {3}},
                      {26, {3}},    {0, {0}},     {2, {0}},          {19, {0}},
                      {27, {0}},    {100, {0}},   {0xFFFFFFFFu, {0}}};
  for (const Row& row : rows) {
    BlueLight light;
    EXPECT_TRUE(light.setOperationalStatus(row.status));
    EXPECT_EQ(light.getOperationalStatus(), row.expected) << "status " << row.status;
  }
}

TEST(BlueLightRecord, OperationalStatusIsReplacedNotAccumulated) {
  BlueLight light;
  light.setOperationalStatus(20);
  EXPECT_EQ(light.getOperationalStatus(), (Status{3, 5}));
  light.setOperationalStatus(1);
  EXPECT_EQ(light.getOperationalStatus(), (Status{2, 11}));
  light.setOperationalStatus(1);
  EXPECT_EQ(light.getOperationalStatus(), (Status{2, 11}));
}

TEST(BlueLightRecord, HealthStateTable) {
  struct Row {
    unsigned status;
    unsigned short expected;
  };
  const Row rows[] = {{1, 5}, {20, 10}, {23, 10}, {26, 10},        {0, 0},
                      {2, 0}, {19, 0},  {27, 0},  {0xFFFFFFFFu, 0}};
  for (const Row& row : rows) {
    BlueLight light;
    EXPECT_TRUE(light.setHealthState(row.status));
    EXPECT_EQ(light.getHealthState(), row.expected) << "status " << row.status;
  }
}

TEST(BlueLightRecord, RequestedStateTable) {
  struct Row {
    unsigned status;
    unsigned short expected;
  };
  const Row rows[] = {{1, 2}, {20, 2}, {26, 2}, {0, 3}, {2, 3}, {19, 3}, {27, 3}};
  for (const Row& row : rows) {
    BlueLight light;
    EXPECT_TRUE(light.setRequestedState(row.status));
    EXPECT_EQ(light.getRequestedState(), row.expected) << "status " << row.status;
  }
}

TEST(BlueLightRecord, AlarmStateKeepsZeroToThree) {
  for (unsigned short state = 0; state <= 3; ++state) {
    BlueLight light;
    EXPECT_TRUE(light.setAlarmState(state));
    EXPECT_EQ(light.getAlarmState(), state);
  }
  for (unsigned short state : {4, 7, 255, 65535}) {
    BlueLight light;
    light.setAlarmState(2);
    EXPECT_TRUE(light.setAlarmState(static_cast<unsigned short>(state)));
    EXPECT_EQ(light.getAlarmState(), 0) << "state " << state;
  }
}

TEST(BlueLightRecord, EmptyNamesAreRefusedButStored) {
  BlueLight light;
  light.setElementName("old");
  EXPECT_FALSE(light.setElementName(""));
  EXPECT_EQ(light.elementName, "");
  EXPECT_EQ(light.getElementName(), "");
  light.setDeviceID("old");
  EXPECT_FALSE(light.setDeviceID(""));
  EXPECT_EQ(light.deviceID, "");
  EXPECT_TRUE(light.setDeviceID("Blue Light:1.2"));
  EXPECT_TRUE(light.setElementName("Blue Light"));
}

TEST(BlueLightRecord, GettersStripSurroundingBlanksFieldsKeepThem) {
  BlueLight light;
  EXPECT_TRUE(light.setElementName("  Blue Light \t"));
  EXPECT_EQ(light.elementName, "  Blue Light \t");
  EXPECT_EQ(light.getElementName(), "Blue Light");
  EXPECT_TRUE(light.setDeviceID(" Blue Light:1.2\n"));
  EXPECT_EQ(light.deviceID, " Blue Light:1.2\n");
  EXPECT_EQ(light.getDeviceID(), "Blue Light:1.2");
  // A name of blanks only is stored and counts as given; its stripped form is empty.
  EXPECT_TRUE(light.setElementName("   "));
  EXPECT_EQ(light.getElementName(), "");
}

TEST(BlueLightRecord, AlarmSettersStoreAndSucceed) {
  BlueLight light;
  EXPECT_TRUE(light.setAudibleAlarm(true));
  EXPECT_TRUE(light.setVisibleAlarm(true));
  EXPECT_TRUE(light.setMotionAlarm(true));
  EXPECT_TRUE(light.getAudibleAlarm());
  EXPECT_TRUE(light.getVisibleAlarm());
  EXPECT_TRUE(light.getMotionAlarm());
  EXPECT_TRUE(light.setVisibleAlarm(false));
  EXPECT_FALSE(light.getVisibleAlarm());
}

TEST(BlueLightRecord, CopiesAreIndependent) {
  BlueLight light;
  light.setDeviceID("A:1");
  light.setOperationalStatus(20);
  BlueLight copy = light;
  copy.setOperationalStatus(1);
  copy.setDeviceID("B:2");
  EXPECT_EQ(light.getOperationalStatus(), (Status{3, 5}));
  EXPECT_EQ(light.getDeviceID(), "A:1");
  EXPECT_EQ(copy.getDeviceID(), "B:2");
}

}  // namespace
