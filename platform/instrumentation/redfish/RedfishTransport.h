// The HTTPS transport of "redfish:" sources: the plug-in bluelight-redfish.so (see
// RedfishPluginApi.h), opened with dlopen the first time a Redfish source is read, and the session
// of one walk on top of it. The plug-in only carries GETs; the rules about what is fetched live
// here, where they are tested without a network: the deadline, the size limit, and which
// redirections are followed (only to a path of the same service: https, the same host, the same
// port; at most kRedfishMaxRedirects in a row), so the credentials never go to another host.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHTRANSPORT_H
#define KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHTRANSPORT_H

#include <cstddef>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/redfish-plugin/RedfishPluginApi.h"
#include "instrumentation/redfish/RedfishCredentials.h"
#include "instrumentation/redfish/RedfishWalk.h"
#include "os/Clock.h"

namespace Kesta {
namespace platform {

// The largest answer read for one resource. A chassis or drive is a few kilobytes; a collection
// of a thousand members some tens.
constexpr std::size_t kRedfishAnswerLimit = std::size_t{1024} * 1024;
// Redirections followed in a row for one resource (same service only).
constexpr unsigned int kRedfishMaxRedirects = 3;

// Where the plug-in is looked for, in order (see pluginCandidates in PluginLoader.h):
//   <binaryDirectory>/bluelightprofileprovider/bluelight-redfish.so
//   <binaryDirectory>/../lib/bluelightprofileprovider/bluelight-redfish.so
//   <CMAKE_INSTALL_FULL_LIBDIR>/bluelightprofileprovider/bluelight-redfish.so
std::vector<std::string> redfishPluginCandidates(const std::string& binaryDirectory);

// The plug-in's entry points. The plug-in is never unloaded, and one that is loaded already is
// not loaded again: the dynamic loader hands back the same library, so every call gives the same
// table. Throws SourceError, saying where it looked, when it is missing or unusable.
const BluelightRedfishApi& redfishPlugin();

// The plug-in as one source keeps it between its walks: looked for at the first walk only, and
// again at the next walk when it could not be loaded. Each source has its own, so nothing about
// the plug-in is kept in a global of the platform. Safe to use from several threads.
class RedfishPluginCache {
 public:
  // redfishPlugin(), the first time it succeeds; the same table afterwards.
  const BluelightRedfishApi& get();

 private:
  std::mutex mutex_;
  const BluelightRedfishApi* api_ = nullptr;  // guarded by mutex_
};

// The service a session talks to.
struct RedfishTarget {
  std::string host;  // lower case; an IPv6 address without brackets
  unsigned int port = 443;
  RedfishCredentials credentials;
  std::string caFile;  // empty: the system's authorities
  bool verify = true;  // false only for insecure=yes
};

// Where a redirection leads, when it may be followed: the path (with any query) of a URL on the
// same service, "https://<host>[:<port>]/..." with the target's host (in any letter case) and
// port (443 when none is written). Otherwise `path` is empty and `problem` says why not.
struct RedirectTarget {
  std::string path;
  std::string problem;
};
RedirectTarget sameServiceRedirect(std::string_view location, const std::string& host,
                                   unsigned int port);

// "HTTP status 404 (Not Found)", with a word on what the usual statuses mean here.
std::string httpStatusText(unsigned int status);

// Opens a session for one walk through `api`; throws SourceError when the plug-in cannot. Each
// GET is given the time left until its deadline by `clock`, and none at all when none is left.
std::unique_ptr<RedfishSession> openRedfishSession(const BluelightRedfishApi& api,
                                                   const RedfishTarget& target,
                                                   std::shared_ptr<const Clock> clock);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHTRANSPORT_H
