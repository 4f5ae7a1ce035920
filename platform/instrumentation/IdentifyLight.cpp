#include "instrumentation/IdentifyLight.h"

#include "KestaInstrumentation.h"

namespace Kesta {
namespace platform {

namespace {

constexpr unsigned int kStatusOk = 1;
constexpr unsigned int kStatusNone = 0;
constexpr unsigned int kAlarmOff = 1;
constexpr unsigned int kAlarmSteady = 2;
constexpr unsigned int kAlarmAlternating = 3;

}  // namespace

unsigned int identifyAlarmState(IdentifyState state, OnReport onReport) {
  if (state == IdentifyState::Off) {
    return kAlarmOff;
  }
  return onReport == OnReport::Steady ? kAlarmSteady : kAlarmAlternating;
}

InstrumentationNode identifyNode(const IdentifyReading& reading, const std::string& path,
                                 const std::string& description, OnReport onReport) {
  InstrumentationNode node;
  node.type = NodeLexicon::NODE_TYPE_BLUE_LIGHT;
  node.path = path;
  node.description = description;
  switch (reading.kind) {
    case IdentifyReading::Kind::Known:
      node.status = kStatusOk;
      node.properties.push_back(
          {NodeLexicon::PROPERTY_ALARM_STATE, identifyAlarmState(reading.state, onReport)});
      break;
    case IdentifyReading::Kind::NotReported:
      node.status = kStatusNone;
      break;
    case IdentifyReading::Kind::Unusable:
      node.status = kIdentifyStatusUnreadable;
      break;
  }
  return node;
}

}  // namespace platform
}  // namespace Kesta
