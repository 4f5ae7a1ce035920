#include "Discover.h"

#include <exception>
#include <sstream>

#include "KestaInstrumentation.h"

namespace bluelight::cli {

namespace {

using Kesta::platform::SourceOutcome;

std::string originText(const Kesta::platform::SourceSetting& setting) {
  if (setting.origin == "default") return "the default";
  return "from " + setting.origin;
}

std::string lightCount(std::size_t count) {
  return std::to_string(count) + (count == 1 ? " light" : " lights");
}

std::string padded(const std::string& text, std::size_t width) {
  return text.size() >= width ? text + " " : text + std::string(width - text.size(), ' ');
}

const cmpihost::Value* property(const cmpihost::InstanceValue& instance, const char* name) {
  const cmpihost::Value* value = instance.find(name);
  return value != nullptr && !value->isNull() ? value : nullptr;
}

std::string numberWord(const cmpihost::InstanceValue& light, const char* name,
                       const std::vector<std::pair<unsigned, const char*>>& words) {
  const cmpihost::Value* value = property(light, name);
  if (value == nullptr) return "-";
  try {
    const auto number = value->asUnsigned();
    for (const auto& [known, word] : words) {
      if (number == known) return std::to_string(number) + " " + word;
    }
    return std::to_string(number);
  } catch (const std::exception&) {
    return value->toString();
  }
}

}  // namespace

DiscoveredSources discoverSources() {
  DiscoveredSources sources;
  try {
    sources.setting = Kesta::platform::configuredSource();
  } catch (const std::exception& error) {
    sources.settingProblem = error.what();
    return sources;
  }
  Kesta::platform::SourceListReading reading = Kesta::platform::readSourceList(
      sources.setting, Kesta::platform::SourceSystem{}, Kesta::platform::discoveryRoots());
  sources.outcomes = std::move(reading.outcomes);
  sources.notes = std::move(reading.notes);
  return sources;
}

std::string sourcesText(const DiscoveredSources& sources) {
  std::ostringstream out;
  if (!sources.settingProblem.empty()) {
    out << "sources: the configuration cannot be used: " << sources.settingProblem << "\n";
    return out.str();
  }
  out << "sources: " << sources.setting.text << " (" << originText(sources.setting) << ")\n";
  for (const SourceOutcome& outcome : sources.outcomes) {
    const bool gaveLights = outcome.state == SourceOutcome::State::Read && outcome.lights > 0;
    out << "  " << padded(Kesta::platform::toString(outcome.state), 11)
        << padded(outcome.state == SourceOutcome::State::Read ? lightCount(outcome.lights) : "-",
                  11)
        << outcome.text;
    if (!gaveLights && !outcome.why.empty()) out << "  (" << outcome.why << ")";
    out << "\n";
  }
  for (const std::string& note : sources.notes) out << "  note: the list " << note << "\n";
  return out.str();
}

std::vector<std::string> discoveredProperties() {
  return {"DeviceID", "ElementName", "AlarmState", "HealthState", "OperationalStatus"};
}

std::string lightsText(const std::vector<cmpihost::InstanceValue>& lights) {
  std::ostringstream out;
  out << "lights: " << lights.size() << "\n";
  if (lights.empty()) return out.str();
  out << "  " << padded("AlarmState", 16) << padded("HealthState", 14) << "DeviceID\n";
  for (const cmpihost::InstanceValue& light : lights) {
    const cmpihost::Value* deviceId = property(light, "DeviceID");
    out << "  "
        << padded(numberWord(light, "AlarmState",
                             {{0, "unknown"}, {1, "off"}, {2, "steady"}, {3, "alternating"}}),
                  16)
        << padded(numberWord(light, "HealthState", {{0, "unknown"}, {5, "OK"}, {10, "degraded"}}),
                  14)
        << (deviceId != nullptr && deviceId->type() == CMPI_string ? deviceId->asString() : "-")
        << "\n";
  }
  return out.str();
}

Json jsonSources(const DiscoveredSources& sources) {
  Json json = Json::object();
  Json setting = Json::object();
  setting["text"] = sources.setting.text;
  setting["origin"] = sources.setting.origin;
  setting["problem"] =
      sources.settingProblem.empty() ? Json(nullptr) : Json(sources.settingProblem);
  json["setting"] = setting;
  Json list = Json::array();
  for (const SourceOutcome& outcome : sources.outcomes) {
    Json entry = Json::object();
    entry["source"] = outcome.text;
    entry["listedAs"] = outcome.listedAs;
    entry["state"] = Kesta::platform::toString(outcome.state);
    entry["lights"] = outcome.lights;
    entry["why"] = outcome.why.empty() ? Json(nullptr) : Json(outcome.why);
    list.push_back(entry);
  }
  json["sources"] = list;
  json["notes"] = sources.notes;
  return json;
}

}  // namespace bluelight::cli
