// One walk of a Redfish service: from the service root to the Chassis collection, each chassis,
// and (unless the source says drives=no) the drives each chassis links, following the links the
// answers give and nothing else. The walk asks a RedfishSession for each resource, so the same
// code runs against the HTTPS transport and against a test's table of answers.
//
// What goes wrong is sorted by how much of the walk it spoils:
//   - the service root or the first page of the Chassis collection cannot be read (no
//     connection, a certificate that is not accepted, an HTTP error, no answer in time, not JSON
//     or not of the shape): nothing can be walked, so the source cannot be used: SourceError;
//   - a chassis, storage resource, drive or later collection page cannot be read (an HTTP error,
//     too large, not JSON, a redirection that is not followed): one problem line, and the lights
//     it would have given are left out;
//   - a light's property holds a wrong value: one problem line, and the light is listed as
//     unreadable (status 21, no alarm state);
//   - the time is up, or the connection is lost, during the walk: one problem line for the rest
//     of the walk, which ends there; the lights read so far are kept.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHWALK_H
#define KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHWALK_H

#include <chrono>
#include <string>
#include <vector>

#include "instrumentation/IdentifyLight.h"
#include "instrumentation/InstrumentationSource.h"
#include "os/Clock.h"

namespace Kesta {
namespace platform {

// Where every walk starts: the one URL of a service that is not read from a link.
constexpr const char* kRedfishServiceRoot = "/redfish/v1/";

// One GET as the walk sees it.
struct RedfishAnswer {
  enum class Kind {
    Body,      // a successful answer (2xx); `body` holds it
    Refused,   // an answer that cannot be used: an HTTP error status, a body over the limit, a
               // redirection that is not followed; `problem` says which
    TimedOut,  // the walk's time was up first; `problem` says what did not happen
    Lost       // no answer: no connection, a certificate that is not accepted, a broken
               // transfer; `problem` says why
  };
  Kind kind = Kind::Lost;
  std::string body;
  std::string problem;

  static RedfishAnswer ok(std::string body) { return {Kind::Body, std::move(body), {}}; }
  static RedfishAnswer refused(std::string why) { return {Kind::Refused, {}, std::move(why)}; }
  static RedfishAnswer timedOut(std::string what) { return {Kind::TimedOut, {}, std::move(what)}; }
  static RedfishAnswer lost(std::string why) { return {Kind::Lost, {}, std::move(why)}; }
};

// The connection of one walk to one service.
class RedfishSession {
 public:
  RedfishSession() = default;
  virtual ~RedfishSession();
  RedfishSession(const RedfishSession&) = delete;
  RedfishSession& operator=(const RedfishSession&) = delete;

  // GET `path` (a path of the service), not past `deadline`.
  virtual RedfishAnswer get(const std::string& path, Clock::time_point deadline) = 0;
  // How many connections (TLS handshakes) the session has opened so far.
  virtual unsigned int connections() const = 0;
};

struct RedfishWalkSettings {
  std::string pathPrefix;  // the start of every node path: "redfish:<host>:<port>"
  bool drives = true;
  OnReport onReport = OnReport::Alternating;
  std::chrono::milliseconds timeout{0};  // the walk's limit, for the messages
};

struct RedfishWalkResult {
  // One node per chassis and drive that reports a light: path "<pathPrefix><@odata.id>",
  // description the chassis' Name, or "<drive Name> in <chassis Name>" (the @odata.id in place
  // of a missing Name). A chassis comes before its drives; chassis come in the collection's
  // order, drives in their chassis' order.
  std::vector<InstrumentationNode> nodes;
  // One text per log line, each to follow "Instrumentation source \"<name>\" ".
  std::vector<std::string> problems;
};

// Walks the service through `session`. Throws SourceError when the service root or the first
// page of the Chassis collection cannot be read (the text names the path and why).
RedfishWalkResult walkRedfishService(RedfishSession& session, const RedfishWalkSettings& settings,
                                     Clock::time_point deadline);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHWALK_H
