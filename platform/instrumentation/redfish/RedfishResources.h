// What the Redfish source reads out of the answers of a service, and the blue-light node a
// resource becomes. Pure functions of the answer's text: no network, no clock, no log, so that
// every rule is tested on its own (tests/platform/redfish_resources_test.cpp).
//
// Only the properties the walk needs are read, by their names in the published Redfish schema;
// everything else in an answer is ignored, so newer versions of a resource read as well as older
// ones. A link is an object {"@odata.id": "<path>"}, and the walk follows only links whose path
// lies in this service (isRedfishServicePath): it never makes up a URL and never leaves the host.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHRESOURCES_H
#define KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHRESOURCES_H

#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/IdentifyLight.h"
#include "instrumentation/InstrumentationSource.h"

namespace Kesta {
namespace platform {

// Node status for Status.Health "Warning" (the module shows it as degraded, like "Critical").
constexpr unsigned int kRedfishStatusWarning = 20;
// Node status for Status.Health "Critical"; the same as that of an unreadable light.
constexpr unsigned int kRedfishStatusCritical = kIdentifyStatusUnreadable;

// The longest Name used as a light's description; a longer one is passed over for the path.
constexpr std::size_t kRedfishNameMax = 256;

// Why an answer cannot be read as the resource the walk asked for: it is not JSON, or not of the
// shape of that resource. The text says what is wrong, never what the answer holds beyond it.
class RedfishAnswerError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

// A list of links (Links.Drives, Links.Storage, a Storage's Drives).
struct RedfishLinks {
  bool present = false;            // the property is there (an empty list is there too)
  std::vector<std::string> paths;  // when present and usable: the paths, in order
  std::string problem;             // when present but not a list of links of this service
};

// The identify light a resource reports, before it becomes a node.
struct RedfishIndicator {
  enum class Kind {
    Absent,       // neither property: the resource has no light
    NotReported,  // the property is null (or IndicatorLED "Unknown"): the state is not known now
    Off,          // false, "Off"
    On,           // true, "Blinking": reported as the source's on= says
    Lit,          // "Lit": steady, whatever on= says
    Wrong         // a value of the wrong type or outside the schema's values; `problem` says which
  };
  Kind kind = Kind::Absent;
  std::string problem;
};

// Status.Health.
struct RedfishHealth {
  enum class Kind { Ok, Warning, Critical, Wrong };  // Ok also when absent or null
  Kind kind = Kind::Ok;
  std::string problem;
};

// A chassis or a drive, as far as its light goes.
struct RedfishLightResource {
  std::string name;  // Name, when it is text that can describe a light (else empty)
  RedfishIndicator indicator;
  RedfishHealth health;
};

struct RedfishChassis : RedfishLightResource {
  RedfishLinks drives;   // Links.Drives
  RedfishLinks storage;  // Links.Storage
};

struct RedfishServiceRoot {
  std::optional<std::string> chassis;  // the path of the Chassis collection, if the service has one
};

struct RedfishCollectionPage {
  std::vector<std::string> members;  // Members
  // Members@odata.nextLink: the next page of a long collection, a path of the service with the
  // query the service chose (e.g. "/redfish/v1/Chassis?$skip=50")
  std::optional<std::string> next;
};

// Each throws RedfishAnswerError when `body` is not JSON or not an object, and when a property the
// walk needs from it is not of its shape (the service root's Chassis link, a collection's Members
// and next page). A chassis or drive whose light properties are wrong is not an error here: they
// read as RedfishIndicator::Kind::Wrong or RedfishHealth::Kind::Wrong, and link lists that cannot
// be followed carry their problem.
RedfishServiceRoot readRedfishServiceRoot(std::string_view body);
RedfishCollectionPage readRedfishCollection(std::string_view body);
// A chassis: LocationIndicatorActive, else IndicatorLED; LocationIndicatorActive wins when it
// holds true or false.
RedfishChassis readRedfishChassis(std::string_view body);
// A drive: LocationIndicatorActive only.
RedfishLightResource readRedfishDrive(std::string_view body);
// A storage resource: its Drives.
RedfishLinks readRedfishStorage(std::string_view body);

// True for a path a link of this service may name: "/redfish/v1" or a path below it, written
// with the characters of a URL path (percent escapes included), without a query, a fragment or
// "." and ".." segments, at most 1024 bytes.
bool isRedfishServicePath(std::string_view path);

// The node of a resource that reports a light at `path` (the node's path text), with
// `description`; none for a resource that reports no light. Known states give node status 1,
// 20 or 21 by Status.Health and the alarm state of the identify light (IdentifyLight.h); a state
// that is not reported gives status 0; a wrong property gives the unreadable light (status 21,
// no alarm state) and puts the reason in `problem` (which is emptied otherwise).
std::optional<InstrumentationNode> redfishLightNode(const RedfishLightResource& resource,
                                                    const std::string& path,
                                                    const std::string& description,
                                                    OnReport onReport, std::string& problem);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHRESOURCES_H
