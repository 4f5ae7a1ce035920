// The light model: BlueLight and BlueLightCapabilities records, and the collector that reads
// every blue light of the instrumentation tree into records.
#include "BlueLight.h"

#include <exception>
#include <iostream>
#include <string>
#include <utility>
#include <vector>

#include "KestaCommon.h"
#include "KestaInstrumentation.h"
#include "KestaTrace.h"

namespace Kesta {

// Logger category of this unit.
static const std::string loggerBlueLight("Varnel.BlueLight");

namespace BlueLightProvider {
namespace {

constexpr const char* kSourceFile = "BlueLight.cpp";

// Node status codes of the instrumentation: 1 is a working node, 20 to 26 are the degraded ones
// (20 also predicts a failure).
constexpr unsigned int kStatusOk = 1;
constexpr unsigned int kStatusPredictiveFailure = 20;
constexpr unsigned int kStatusDegradedLast = 26;

bool isDegraded(unsigned int status) {
  return status >= kStatusPredictiveFailure && status <= kStatusDegradedLast;
}

// CIM values of an alarm device.
constexpr unsigned short kRequestedStateEnabled = 2;
constexpr unsigned short kRequestedStateDisabled = 3;
constexpr unsigned short kHealthUnknown = 0;
constexpr unsigned short kHealthOk = 5;
constexpr unsigned short kHealthDegraded = 10;
constexpr unsigned short kOperationalUnknown = 0;
constexpr unsigned short kOperationalOk = 2;
constexpr unsigned short kOperationalDegraded = 3;
constexpr unsigned short kOperationalPredictiveFailure = 5;
constexpr unsigned short kOperationalInService = 11;
constexpr unsigned short kAlarmStateHighest = 3;

const char* const kCapabilitiesInstanceID = "KESTA:BlueLightCapabilities1";

}  // namespace

// ---------------------------------------------------------------------------------------------
// BlueLight
// ---------------------------------------------------------------------------------------------

BlueLight::BlueLight()
    : requestedState(0),
      healthState(0),
      audibleAlarm(false),
      visibleAlarm(false),
      motionAlarm(false),
      alarmState(0) {}

std::string BlueLight::getDeviceID() const { return Kesta::stripSpaces(deviceID); }

std::string BlueLight::getElementName() const { return Kesta::stripSpaces(elementName); }

bool BlueLight::setDeviceID(std::string id) {
  deviceID = std::move(id);
  return !deviceID.empty();
}

bool BlueLight::setElementName(std::string name) {
  elementName = std::move(name);
  return !elementName.empty();
}

bool BlueLight::setAudibleAlarm(bool alarm) {
  audibleAlarm = alarm;
  return true;
}

bool BlueLight::setVisibleAlarm(bool alarm) {
  visibleAlarm = alarm;
  return true;
}

bool BlueLight::setMotionAlarm(bool alarm) {
  motionAlarm = alarm;
  return true;
}

bool BlueLight::setRequestedState(unsigned int status) {
  requestedState = (status == kStatusOk || isDegraded(status)) ? kRequestedStateEnabled
                                                               : kRequestedStateDisabled;
  return true;
}

bool BlueLight::setHealthState(unsigned int status) {
  if (status == kStatusOk) {
    healthState = kHealthOk;
  } else if (isDegraded(status)) {
    healthState = kHealthDegraded;
  } else {
    healthState = kHealthUnknown;
  }
  return true;
}

bool BlueLight::setOperationalStatus(unsigned int status) {
  operationalStatus.clear();
  if (status == kStatusOk) {
    operationalStatus.push_back(kOperationalOk);
    operationalStatus.push_back(kOperationalInService);
  } else if (status == kStatusPredictiveFailure) {
    operationalStatus.push_back(kOperationalDegraded);
    operationalStatus.push_back(kOperationalPredictiveFailure);
  } else if (isDegraded(status)) {
    operationalStatus.push_back(kOperationalDegraded);
  } else {
    operationalStatus.push_back(kOperationalUnknown);
  }
  return true;
}

bool BlueLight::setAlarmState(unsigned short state) {
  alarmState = state <= kAlarmStateHighest ? state : 0;
  return true;
}

// ---------------------------------------------------------------------------------------------
// BlueLightCapabilities
// ---------------------------------------------------------------------------------------------

// elementNameEditSupported is only ever meaningful after its getter ran; it starts false so that
// copying a fresh record never reads an indeterminate bool.
BlueLightCapabilities::BlueLightCapabilities() : elementNameEditSupported(false) {}

std::string BlueLightCapabilities::getInstanceID() {
  instanceID = kCapabilitiesInstanceID;
  return instanceID;
}

bool BlueLightCapabilities::getElementNameEditSupported() {
  elementNameEditSupported = false;
  return elementNameEditSupported;
}

std::vector<unsigned short> BlueLightCapabilities::getAlarmStatesSupported() {
  alarmStatesSupported.push_back(1);  // Off
  alarmStatesSupported.push_back(2);  // Steady
  alarmStatesSupported.push_back(3);  // Alternating
  return alarmStatesSupported;
}

// ---------------------------------------------------------------------------------------------
// Collector
// ---------------------------------------------------------------------------------------------

unsigned short getBlueLightInstances(std::vector<BlueLight>& lights) {
  try {
    Kesta::Instrumentation cursor;
    cursor.selectNode(Kesta::NodeLexicon::NODE_TYPE_BLUE_LIGHT);
    setVector(lights, cursor);
  } catch (const std::exception&) {
    // An unreadable tree or a node that cannot be recorded ends the walk; the caller only needs
    // to know that the list is incomplete.
    return 1;
  }
  return 0;
}

unsigned short setVector(std::vector<BlueLight>& lights, Kesta::Instrumentation& cursor) {
  auto parameters = [&](VNLog::VNMessageBuffer& list) {
    list << " vectBlueLight=" << &lights << " instrumentation=" << &cursor;
  };
  KESTA_TRACE_PARA(loggerBlueLight, kTraceLevel, ENTERING, parameters);

  while (cursor) {
    BlueLight light;
    const std::string path = cursor.getPathToNode();
    const std::string pathText = cursor.convertPathToString(path);
    const std::string description = cursor.getNodeDescription();

    if (!light.setDeviceID(std::string(description).append(":").append(pathText))) {
      throw ProviderException("Failed while setting Device ID");
    }
    if (!light.setElementName(description)) {
      throw ProviderException("Failed while setting Element Name");
    }
    const unsigned int status = cursor.getNodeStatus();
    if (status != 0) {
      if (!light.setOperationalStatus(status)) {
        throw ProviderException("Failed while setting Operational Status");
      }
      if (!light.setHealthState(status)) {
        throw ProviderException("Failed while setting Health State");
      }
    }
    // The light is reported as enabled whatever its node status: the collector always asks for
    // the state of a working node.
    if (!light.setRequestedState(kStatusOk)) {
      throw ProviderException("Failed while setting Requested State");
    }
    if (!light.setAudibleAlarm(false)) {
      throw ProviderException("Failed while setting AudibleAlarm");
    }
    // The visible alarm reports its failure with the audible alarm's text; kept as it is.
    if (!light.setVisibleAlarm(true)) {
      throw ProviderException("Failed while setting AudibleAlarm");
    }
    if (!light.setMotionAlarm(false)) {
      throw ProviderException("Failed while setting MotionAlarm");
    }
    unsigned int value = 0;
    if (cursor.getProperty(Kesta::NodeLexicon::PROPERTY_ALARM_STATE, value)) {
      if (!light.setAlarmState(static_cast<unsigned short>(value))) {
        throw ProviderException("Failed while setting AlarmState");
      }
    }
    lights.push_back(std::move(light));
    ++cursor;
  }

  KESTA_TRACE_PARA(loggerBlueLight, kTraceLevel, EXITING, parameters);
  return 0;
}

unsigned short getBlueLightCapabilitiesInstances(std::vector<BlueLightCapabilities>& capabilities) {
  try {
    BlueLightCapabilities record;
    capabilities.push_back(record);
  } catch (const std::exception& error) {
    std::cerr << error.what() << std::endl;
    return 1;
  }
  return 0;
}

}  // namespace BlueLightProvider
}  // namespace Kesta
