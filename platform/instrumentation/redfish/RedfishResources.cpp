// The answers are small (a resource is a few kilobytes at most) and read once each, so they are
// parsed into simdjson's DOM, which checks the whole text (UTF-8 included) before anything is
// read, and a parser is made for each answer: keeping one between calls would mean a lock or
// memory per thread for no measurable gain next to the network round trip.
//
// The same setting as the snapshot reader, so that simdjson's inline functions read the same in
// every translation unit.
#define SIMDJSON_DEVELOPMENT_CHECKS 0
#include "instrumentation/redfish/RedfishResources.h"

#include <simdjson.h>

#include <algorithm>
#include <utility>

#include "KestaCommonBase.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

namespace dom = simdjson::dom;

constexpr unsigned int kStatusOk = 1;
constexpr std::size_t kPathMax = 1024;
// How much of a wrong string value a message shows.
constexpr std::size_t kShownValueMax = 40;

constexpr const char* kRoot = "/redfish/v1";

[[noreturn]] void refuse(const std::string& why) { throw RedfishAnswerError(why); }

// Parses `body`; it must be one JSON object.
template <typename Use>
auto withObject(std::string_view body, Use use) {
  if (body.empty()) {
    refuse("the answer is empty");
  }
  dom::parser parser;
  dom::element root;
  if (const simdjson::error_code error = parser.parse(body.data(), body.size(), true).get(root);
      error != simdjson::SUCCESS) {
    refuse(std::string("the answer is not valid JSON: ") + simdjson::error_message(error));
  }
  dom::object object;
  if (root.get(object) != simdjson::SUCCESS) {
    refuse("the answer is not a JSON object");
  }
  return use(object);
}

// A value as a message shows it: its type and, for short scalars, the value.
std::string describe(dom::element value) {
  switch (value.type()) {
    case dom::element_type::OBJECT:
      return "an object";
    case dom::element_type::ARRAY:
      return "an array";
    case dom::element_type::STRING: {
      std::string_view text;
      if (value.get(text) != simdjson::SUCCESS) {
        return "a string";
      }
      if (text.size() > kShownValueMax) {
        return "a string of " + std::to_string(text.size()) + " bytes";
      }
      return "the string \"" + printable(text) + "\"";
    }
    case dom::element_type::NULL_VALUE:
      return "null";
    case dom::element_type::BOOL:
      return simdjson::to_string(value);
    default:
      return "the number " + simdjson::to_string(value);
  }
}

// The member `name`, if the object has it.
std::optional<dom::element> member(dom::object object, std::string_view name) {
  dom::element value;
  if (object.at_key(name).get(value) != simdjson::SUCCESS) {
    return std::nullopt;
  }
  return value;
}

bool isUnreserved(char c) {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '-' ||
         c == '.' || c == '_' || c == '~';
}
bool isSubDelimiter(char c) {
  return c == '!' || c == '$' || c == '&' || c == '\'' || c == '(' || c == ')' || c == '*' ||
         c == '+' || c == ',' || c == ';' || c == '=';
}
bool isHexDigit(char c) {
  return (c >= '0' && c <= '9') || (c >= 'a' && c <= 'f') || (c >= 'A' && c <= 'F');
}

// A link to the next page of a collection: a path of the service, with a query that says which
// members the page holds (e.g. "?$skip=50").
bool isPageLink(std::string_view link) {
  const std::string_view::size_type question = link.find('?');
  if (!isRedfishServicePath(link.substr(0, question))) {
    return false;
  }
  if (question == std::string_view::npos) {
    return true;
  }
  const std::string_view query = link.substr(question + 1);
  for (std::size_t i = 0; i < query.size(); ++i) {
    const char c = query[i];
    if (c == '%') {
      if (i + 2 >= query.size() || !isHexDigit(query[i + 1]) || !isHexDigit(query[i + 2])) {
        return false;
      }
      i += 2;
    } else if (!isUnreserved(c) && !isSubDelimiter(c) && c != ':' && c != '@' && c != '/' &&
               c != '?') {
      return false;
    }
  }
  return true;
}

// The path of a link object {"@odata.id": "<path>"}; `where` names it in the message.
std::string linkPath(dom::element value, const std::string& where) {
  dom::object object;
  std::string_view path;
  if (value.get(object) != simdjson::SUCCESS) {
    refuse(where + " is " + describe(value) + ", not a link (an object with \"@odata.id\")");
  }
  const std::optional<dom::element> id = member(object, "@odata.id");
  if (!id) {
    refuse(where + " has no \"@odata.id\"");
  }
  if (id->get(path) != simdjson::SUCCESS) {
    refuse(where + ".@odata.id is " + describe(*id) + ", not a path");
  }
  if (!isRedfishServicePath(path)) {
    refuse(where + " links to " + describe(*id) + ", which is not a path of this service");
  }
  return std::string(path);
}

// A list of links; a problem is kept in the result rather than thrown.
RedfishLinks linkList(std::optional<dom::element> value, const std::string& where) {
  RedfishLinks links;
  if (!value) {
    return links;
  }
  links.present = true;
  dom::array array;
  if (value->get(array) != simdjson::SUCCESS) {
    links.problem = where + " is " + describe(*value) + ", not a list of links";
    return links;
  }
  try {
    std::size_t index = 0;
    for (dom::element entry : array) {
      links.paths.push_back(linkPath(entry, where + "[" + std::to_string(index) + "]"));
      ++index;
    }
  } catch (const RedfishAnswerError& error) {
    links.paths.clear();
    links.problem = error.what();
  }
  return links;
}

// Name, when it can describe a light: text that is not blank, without control characters and not
// too long.
std::string usableName(dom::object object) {
  const std::optional<dom::element> value = member(object, "Name");
  std::string_view name;
  if (!value || value->get(name) != simdjson::SUCCESS || name.size() > kRedfishNameMax ||
      stripSpaces(std::string(name)).empty()) {
    return std::string();
  }
  const bool control = std::any_of(name.begin(), name.end(), [](char c) {
    return static_cast<unsigned char>(c) < 0x20 || c == 0x7f;
  });
  return control ? std::string() : std::string(name);
}

// LocationIndicatorActive: Absent when missing.
RedfishIndicator locationIndicator(dom::object object) {
  RedfishIndicator indicator;
  const std::optional<dom::element> value = member(object, "LocationIndicatorActive");
  if (!value) {
    return indicator;
  }
  bool active = false;
  if (value->is_null()) {
    indicator.kind = RedfishIndicator::Kind::NotReported;
  } else if (value->get(active) == simdjson::SUCCESS) {
    indicator.kind = active ? RedfishIndicator::Kind::On : RedfishIndicator::Kind::Off;
  } else {
    indicator.kind = RedfishIndicator::Kind::Wrong;
    indicator.problem =
        "LocationIndicatorActive is " + describe(*value) + ", not true, false or null";
  }
  return indicator;
}

// IndicatorLED, the older property of a chassis: Absent when missing.
RedfishIndicator indicatorLed(dom::object object) {
  RedfishIndicator indicator;
  const std::optional<dom::element> value = member(object, "IndicatorLED");
  if (!value) {
    return indicator;
  }
  std::string_view state;
  if (value->is_null()) {
    indicator.kind = RedfishIndicator::Kind::NotReported;
    return indicator;
  }
  if (value->get(state) == simdjson::SUCCESS) {
    if (state == "Lit") {
      indicator.kind = RedfishIndicator::Kind::Lit;
      return indicator;
    }
    if (state == "Blinking") {
      indicator.kind = RedfishIndicator::Kind::On;
      return indicator;
    }
    if (state == "Off") {
      indicator.kind = RedfishIndicator::Kind::Off;
      return indicator;
    }
    // Early versions of the schema had "Unknown" where later ones have null.
    if (state == "Unknown") {
      indicator.kind = RedfishIndicator::Kind::NotReported;
      return indicator;
    }
  }
  indicator.kind = RedfishIndicator::Kind::Wrong;
  indicator.problem =
      "IndicatorLED is " + describe(*value) + ", not \"Lit\", \"Blinking\", \"Off\" or null";
  return indicator;
}

RedfishHealth health(dom::object object) {
  RedfishHealth result;
  const std::optional<dom::element> status = member(object, "Status");
  if (!status || status->is_null()) {
    return result;
  }
  dom::object fields;
  if (status->get(fields) != simdjson::SUCCESS) {
    result.kind = RedfishHealth::Kind::Wrong;
    result.problem = "Status is " + describe(*status) + ", not an object";
    return result;
  }
  const std::optional<dom::element> value = member(fields, "Health");
  if (!value || value->is_null()) {
    return result;
  }
  std::string_view text;
  if (value->get(text) == simdjson::SUCCESS) {
    if (text == "OK") {
      return result;
    }
    if (text == "Warning") {
      result.kind = RedfishHealth::Kind::Warning;
      return result;
    }
    if (text == "Critical") {
      result.kind = RedfishHealth::Kind::Critical;
      return result;
    }
  }
  result.kind = RedfishHealth::Kind::Wrong;
  result.problem =
      "Status.Health is " + describe(*value) + ", not \"OK\", \"Warning\", \"Critical\" or null";
  return result;
}

std::optional<dom::object> linksObject(dom::object object, RedfishChassis& chassis) {
  const std::optional<dom::element> value = member(object, "Links");
  if (!value) {
    return std::nullopt;
  }
  dom::object links;
  if (value->get(links) != simdjson::SUCCESS) {
    chassis.drives.present = true;
    chassis.drives.problem = "Links is " + describe(*value) + ", not an object";
    return std::nullopt;
  }
  return links;
}

}  // namespace

RedfishServiceRoot readRedfishServiceRoot(std::string_view body) {
  return withObject(body, [](dom::object object) {
    RedfishServiceRoot root;
    if (const std::optional<dom::element> chassis = member(object, "Chassis")) {
      root.chassis = linkPath(*chassis, "Chassis");
    }
    return root;
  });
}

RedfishCollectionPage readRedfishCollection(std::string_view body) {
  return withObject(body, [](dom::object object) {
    RedfishCollectionPage page;
    const std::optional<dom::element> members = member(object, "Members");
    if (!members) {
      refuse("it has no \"Members\"");
    }
    RedfishLinks links = linkList(members, "Members");
    if (!links.problem.empty()) {
      refuse(links.problem);
    }
    page.members = std::move(links.paths);
    if (const std::optional<dom::element> next = member(object, "Members@odata.nextLink")) {
      std::string_view path;
      if (next->get(path) != simdjson::SUCCESS || !isPageLink(path)) {
        refuse("Members@odata.nextLink is " + describe(*next) + ", not a path of this service");
      }
      page.next = std::string(path);
    }
    return page;
  });
}

RedfishChassis readRedfishChassis(std::string_view body) {
  return withObject(body, [](dom::object object) {
    RedfishChassis chassis;
    chassis.name = usableName(object);
    chassis.indicator = locationIndicator(object);
    if (chassis.indicator.kind == RedfishIndicator::Kind::Absent ||
        chassis.indicator.kind == RedfishIndicator::Kind::NotReported) {
      // The older property still counts when the newer one says nothing.
      RedfishIndicator led = indicatorLed(object);
      if (led.kind != RedfishIndicator::Kind::Absent) {
        chassis.indicator = std::move(led);
      }
    }
    chassis.health = health(object);
    if (const std::optional<dom::object> links = linksObject(object, chassis)) {
      chassis.drives = linkList(member(*links, "Drives"), "Links.Drives");
      chassis.storage = linkList(member(*links, "Storage"), "Links.Storage");
    }
    return chassis;
  });
}

RedfishLightResource readRedfishDrive(std::string_view body) {
  return withObject(body, [](dom::object object) {
    RedfishLightResource drive;
    drive.name = usableName(object);
    drive.indicator = locationIndicator(object);
    drive.health = health(object);
    return drive;
  });
}

RedfishLinks readRedfishStorage(std::string_view body) {
  return withObject(
      body, [](dom::object object) { return linkList(member(object, "Drives"), "Drives"); });
}

bool isRedfishServicePath(std::string_view path) {
  const std::string_view root = kRoot;
  if (path.size() > kPathMax || path.substr(0, root.size()) != root ||
      (path.size() > root.size() && path[root.size()] != '/')) {
    return false;
  }
  for (std::size_t i = 0; i < path.size(); ++i) {
    const char c = path[i];
    if (c == '%') {
      if (i + 2 >= path.size() || !isHexDigit(path[i + 1]) || !isHexDigit(path[i + 2])) {
        return false;
      }
      i += 2;
    } else if (!isUnreserved(c) && !isSubDelimiter(c) && c != ':' && c != '@' && c != '/') {
      return false;
    }
  }
  // "." and ".." segments would let a link climb out of the path it seems to name.
  std::size_t start = 0;
  while (start <= path.size()) {
    const std::size_t end = std::min(path.find('/', start), path.size());
    const std::string_view segment = path.substr(start, end - start);
    if (segment == "." || segment == "..") {
      return false;
    }
    start = end + 1;
  }
  return true;
}

std::optional<InstrumentationNode> redfishLightNode(const RedfishLightResource& resource,
                                                    const std::string& path,
                                                    const std::string& description,
                                                    OnReport onReport, std::string& problem) {
  problem.clear();
  const RedfishIndicator& indicator = resource.indicator;
  if (indicator.kind == RedfishIndicator::Kind::Absent) {
    return std::nullopt;
  }
  if (indicator.kind == RedfishIndicator::Kind::Wrong) {
    problem = indicator.problem;
  } else if (resource.health.kind == RedfishHealth::Kind::Wrong) {
    problem = resource.health.problem;
  }
  if (!problem.empty()) {
    return identifyNode(IdentifyReading::unusable(problem), path, description, onReport);
  }
  switch (indicator.kind) {
    case RedfishIndicator::Kind::NotReported:
      return identifyNode(IdentifyReading::notReported(), path, description, onReport);
    case RedfishIndicator::Kind::Off:
    case RedfishIndicator::Kind::On:
    case RedfishIndicator::Kind::Lit:
      break;
    default:
      return std::nullopt;
  }
  const IdentifyState state = indicator.kind == RedfishIndicator::Kind::Off
                                  ? IdentifyState::Off
                                  : IdentifyState::IndefinitelyOn;
  // "Lit" says the light glows steadily, whatever the source assumes of lights that are on.
  const OnReport report =
      indicator.kind == RedfishIndicator::Kind::Lit ? OnReport::Steady : onReport;
  InstrumentationNode node = identifyNode(IdentifyReading::known(state), path, description, report);
  switch (resource.health.kind) {
    case RedfishHealth::Kind::Warning:
      node.status = kRedfishStatusWarning;
      break;
    case RedfishHealth::Kind::Critical:
      node.status = kRedfishStatusCritical;
      break;
    default:
      node.status = kStatusOk;
      break;
  }
  return node;
}

}  // namespace platform
}  // namespace Kesta
