// The part of the DMTF CIM schema (2.22 and later) that the KESTA classes inherit: every
// superclass in their chains with the properties it declares or overrides. It is not the whole
// schema, only what a test needs to know which inherited properties a provider may set, with
// which type, and which of them are keys.
#ifndef BLUELIGHT_TESTS_DEPLOY_CIMSCHEMATABLE_H
#define BLUELIGHT_TESTS_DEPLOY_CIMSCHEMATABLE_H

#include <string>
#include <vector>

namespace cimschema {

struct Property {
  std::string name;
  std::string type;  // MOF data type, or the referenced class when `reference`
  bool array = false;
  bool key = false;
  bool reference = false;
};

struct Class {
  std::string name;
  std::string superclass;
  bool association = false;
  std::vector<Property> properties;
};

inline Property str(const char* name, bool key = false) { return {name, "string", false, key}; }
inline Property strA(const char* name) { return {name, "string", true}; }
inline Property u16(const char* name) { return {name, "uint16"}; }
inline Property u16A(const char* name) { return {name, "uint16", true}; }
inline Property u32(const char* name) { return {name, "uint32"}; }
inline Property u64(const char* name) { return {name, "uint64"}; }
inline Property boolean(const char* name) { return {name, "boolean"}; }
inline Property datetime(const char* name) { return {name, "datetime"}; }
inline Property ref(const char* name, const char* target) {
  return {name, target, false, true, true};
}

inline const std::vector<Class>& classes() {
  static const std::vector<Class> table = {
      {"CIM_ManagedElement",
       "",
       false,
       {str("InstanceID"), str("Caption"), str("Description"), str("ElementName")}},
      {"CIM_ManagedSystemElement",
       "CIM_ManagedElement",
       false,
       {datetime("InstallDate"), str("Name"), u16A("OperationalStatus"), strA("StatusDescriptions"),
        str("Status"), u16("HealthState"), u16("CommunicationStatus"), u16("DetailedStatus"),
        u16("OperatingStatus"), u16("PrimaryStatus")}},
      {"CIM_LogicalElement", "CIM_ManagedSystemElement", false, {}},
      {"CIM_EnabledLogicalElement",
       "CIM_LogicalElement",
       false,
       {u16("EnabledState"), str("OtherEnabledState"), u16("RequestedState"), u16("EnabledDefault"),
        datetime("TimeOfLastStateChange"), u16A("AvailableRequestedStates"),
        u16("TransitioningToState")}},
      {"CIM_LogicalDevice",
       "CIM_EnabledLogicalElement",
       false,
       {str("SystemCreationClassName", true), str("SystemName", true),
        str("CreationClassName", true), str("DeviceID", true), boolean("PowerManagementSupported"),
        u16A("PowerManagementCapabilities"), u16("Availability"), u16("StatusInfo"),
        u32("LastErrorCode"), str("ErrorDescription"), boolean("ErrorCleared"),
        strA("OtherIdentifyingInfo"), u64("PowerOnHours"), u64("TotalPowerOnHours"),
        strA("IdentifyingDescriptions"), u16A("AdditionalAvailability"), u64("MaxQuiesceTime"),
        u16("LocationIndicator")}},
      {"CIM_AlarmDevice",
       "CIM_LogicalDevice",
       false,
       {boolean("AudibleAlarm"), boolean("VisibleAlarm"), boolean("MotionAlarm"), u16("Urgency"),
        u16("AlarmState"), boolean("AudioIndicatorIsDisabled"),
        boolean("VisualIndicatorIsDisabled"), boolean("MotionIndicatorIsDisabled")}},
      {"CIM_Capabilities",
       "CIM_ManagedElement",
       false,
       {str("InstanceID", true), str("ElementName")}},
      {"CIM_EnabledLogicalElementCapabilities",
       "CIM_Capabilities",
       false,
       {boolean("ElementNameEditSupported"), u16("MaxElementNameLen"),
        u16A("RequestedStatesSupported"), str("ElementNameMask"), u16A("StateAwareness")}},
      {"CIM_AlarmDeviceCapabilities",
       "CIM_EnabledLogicalElementCapabilities",
       false,
       {u16A("RequestedAlarmStatesSupported"), u16A("AlarmIndicatorTypesConfigurable")}},
      {"CIM_System",
       "CIM_EnabledLogicalElement",
       false,
       {str("CreationClassName", true), str("Name", true), str("NameFormat"),
        str("PrimaryOwnerName"), str("PrimaryOwnerContact"), strA("Roles"),
        strA("OtherIdentifyingInfo"), strA("IdentifyingDescriptions")}},
      {"CIM_ComputerSystem",
       "CIM_System",
       false,
       {str("NameFormat"), strA("OtherIdentifyingInfo"), strA("IdentifyingDescriptions"),
        u16A("Dedicated"), strA("OtherDedicatedDescriptions"), u16("ResetCapability"),
        u16A("PowerManagementCapabilities")}},
      {"CIM_ElementCapabilities",
       "",
       true,
       {ref("ManagedElement", "CIM_ManagedElement"), ref("Capabilities", "CIM_Capabilities"),
        u16A("Characteristics")}},
      {"CIM_Component",
       "",
       true,
       {ref("GroupComponent", "CIM_ManagedElement"), ref("PartComponent", "CIM_ManagedElement")}},
      {"CIM_SystemComponent",
       "CIM_Component",
       true,
       {ref("GroupComponent", "CIM_System"), ref("PartComponent", "CIM_ManagedSystemElement")}},
      {"CIM_SystemDevice",
       "CIM_SystemComponent",
       true,
       {ref("GroupComponent", "CIM_System"), ref("PartComponent", "CIM_LogicalDevice")}},
  };
  return table;
}

// The schema class of that name, or null.
inline const Class* find(const std::string& name) {
  for (const Class& c : classes()) {
    if (c.name == name) return &c;
  }
  return nullptr;
}

}  // namespace cimschema

#endif  // BLUELIGHT_TESTS_DEPLOY_CIMSCHEMATABLE_H
