// `bluelight-cli discover`: the first command an administrator runs on a new server. It tells
// which sources of lights the provider considers here (auto's, or the configured ones), which it
// found, how many lights each gave and why not when it gave none; then the lights themselves as
// the provider publishes them.
#pragma once

#include <cmpihost/value.h>

#include <string>
#include <vector>

#include "JsonFormat.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/SourceList.h"

namespace bluelight::cli {

/// What the sources gave, read in this process by the same platform code the provider runs.
struct DiscoveredSources {
  Kesta::platform::SourceSetting setting;
  /// Set when the configuration itself cannot be used (an unreadable configuration file).
  std::string settingProblem;
  std::vector<Kesta::platform::SourceOutcome> outcomes;
  std::vector<std::string> notes;
};

/// Reads the configured sources (KESTA_INSTRUMENTATION, the configuration file, else auto).
DiscoveredSources discoverSources();

/// The sources as text:
///   sources: auto (the default)
///     read        1 light     ipmi:/dev/ipmi0
///     absent      -           enclosure:  (no /sys/class/enclosure)
std::string sourcesText(const DiscoveredSources& sources);

/// The lights as text, one line each: AlarmState and HealthState in words, then the DeviceID.
std::string lightsText(const std::vector<cmpihost::InstanceValue>& lights);

/// The properties of KESTA_BlueLight that the lights part shows.
std::vector<std::string> discoveredProperties();

/// {"setting": {...}, "sources": [...], "notes": [...]}; the caller adds the lights.
Json jsonSources(const DiscoveredSources& sources);

}  // namespace bluelight::cli
