// The light model: the record of one blue light, the record of the lights' capabilities, and the
// collector that reads the lights from the instrumentation service.
#ifndef KESTA_BLUELIGHT_H
#define KESTA_BLUELIGHT_H

#include <string>
#include <vector>

namespace Kesta {
class Instrumentation;

namespace BlueLightProvider {

// One blue light as the instrumentation reports it, in the terms of a CIM alarm device. A plain
// value type: copied into vectors and maps and passed by value. Everything is public, the fields
// included: the setters translate, they guard no invariant.
class BlueLight {
 public:
  BlueLight();

  // The DeviceID and ElementName without their surrounding blanks (the fields keep them).
  std::string getDeviceID() const;
  std::string getElementName() const;
  // Store the text; true when it is not empty (the empty text is stored all the same).
  bool setDeviceID(std::string deviceID);
  bool setElementName(std::string elementName);

  unsigned short getRequestedState() const { return requestedState; }
  unsigned short getHealthState() const { return healthState; }
  unsigned short getAlarmState() const { return alarmState; }
  std::vector<unsigned short> getOperationalStatus() const { return operationalStatus; }
  bool getAudibleAlarm() const { return audibleAlarm; }
  bool getVisibleAlarm() const { return visibleAlarm; }
  bool getMotionAlarm() const { return motionAlarm; }

  bool setAudibleAlarm(bool alarm);
  bool setVisibleAlarm(bool alarm);
  bool setMotionAlarm(bool alarm);

  // Translate an instrumentation node status code into the CIM value; always true.
  bool setRequestedState(unsigned int status);
  bool setHealthState(unsigned int status);
  bool setOperationalStatus(unsigned int status);
  // 0 to 3 are kept (Unknown, Off, Steady, Alternating); anything else becomes 0. Always true.
  bool setAlarmState(unsigned short state);

  std::string deviceID;
  std::string elementName;
  unsigned short requestedState;
  unsigned short healthState;
  std::vector<unsigned short> operationalStatus;
  bool audibleAlarm;
  bool visibleAlarm;
  bool motionAlarm;
  unsigned short alarmState;
};

// The record behind the one capabilities instance. Its values are constants that the getters
// write into the record before returning them: getAlarmStatesSupported() appends 1, 2, 3 on every
// call, so a record must be fresh (a copy) for each instance built from it. Like BlueLight, a
// plain value type with public fields.
class BlueLightCapabilities {
 public:
  BlueLightCapabilities();

  // Always "KESTA:BlueLightCapabilities1" (stored into the record first).
  std::string getInstanceID();
  // Always false (stored into the record first).
  bool getElementNameEditSupported();
  // Appends 1, 2, 3 to the record's list and returns the whole list.
  std::vector<unsigned short> getAlarmStatesSupported();

  std::string instanceID;
  bool elementNameEditSupported;
  std::vector<unsigned short> spareStates;
  std::vector<unsigned short> alarmStatesSupported;
};

// Appends one record per blue-light node of the instrumentation tree. 0 on success; 1 when the
// tree could not be read or a node could not be turned into a record (the records made before
// that node stay in `lights`).
unsigned short getBlueLightInstances(std::vector<BlueLight>& lights);

// Walks the nodes from where `cursor` stands and appends one record per node. Returns 0, or
// throws Kesta::ProviderException for a node that cannot be recorded.
unsigned short setVector(std::vector<BlueLight>& lights, Kesta::Instrumentation& cursor);

// Appends the one capabilities record. 0 on success, 1 on failure.
unsigned short getBlueLightCapabilitiesInstances(std::vector<BlueLightCapabilities>& capabilities);

}  // namespace BlueLightProvider
}  // namespace Kesta

#endif  // KESTA_BLUELIGHT_H
