// The Redfish source: the identify lights of the chassis and drives of a management controller's
// Redfish service, read over HTTPS (docs/redfish.md).
//
//   redfish:https://<host>[:<port>][/]?credentials=<file>[&<options>]      default port 443
//
// <options> are name=value pairs joined by '&' (SourceOptions.h):
//   credentials=<file>      required: the account, an absolute path (RedfishCredentials.h)
//   ca=<file>               the certificate authorities to trust (PEM), an absolute path,
//                           instead of the system's
//   insecure=yes|no         yes: accept any certificate and host name (default no)
//   drives=yes|no           also the lights of the drives of each chassis (default yes)
//   timeout=<seconds>|<n>ms the longest one walk of the service may take (default 2 s;
//                           10 ms to 60 s)
//   on=alternating|steady   how a light that is on (true, "Blinking") is reported (default
//                           alternating)
// An IPv6 host is written in brackets: redfish:https://[fd00::5]?credentials=...
#ifndef KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHSOURCE_H
#define KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHSOURCE_H

#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/IdentifyLight.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/redfish/RedfishWalk.h"
#include "os/Clock.h"
#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

constexpr unsigned int kRedfishDefaultPort = 443;
constexpr std::chrono::milliseconds kRedfishDefaultTimeout{2000};
constexpr std::chrono::milliseconds kRedfishShortestTimeout{10};
constexpr std::chrono::milliseconds kRedfishLongestTimeout{60000};

// "redfish:..." parsed.
struct RedfishSourceSettings {
  std::string host;  // lower case; an IPv6 address without the brackets
  unsigned int port = kRedfishDefaultPort;
  std::string credentialsFile;
  std::string caFile;  // empty: the system's authorities
  bool insecure = false;
  bool drives = true;
  std::chrono::milliseconds timeout = kRedfishDefaultTimeout;
  OnReport onReport = OnReport::Alternating;
};

// Parses the text after "redfish:". Throws SourceError with the reason.
RedfishSourceSettings parseRedfishSource(std::string_view rest);

// The start of the node path of every light of the service: "redfish:<host>:<port>", e.g.
// "redfish:bmc.example:443", "redfish:[fd00::5]:443". Stable for a given host and port, so the
// lights keep their DeviceIDs from one walk to the next.
std::string redfishPathPrefix(const RedfishSourceSettings& settings);

// What a Redfish source uses of the operating system: the clock its deadlines are measured by and
// the file system the credentials and ca= files are read from. The real ones unless a test hands
// in its own.
struct RedfishSourceSystem {
  std::shared_ptr<const Clock> clock = steadyClock();
  std::shared_ptr<FileSystem> files = systemFileSystem();
};

// Makes the session of one walk. Throws SourceError when the source cannot be used (the
// credentials file, the ca= file, the transport).
using RedfishSessionFactory = std::function<std::unique_ptr<RedfishSession>()>;

// The sessions makeRedfishSource gives its source: the credentials file read afresh, the ca= file
// checked, the transport plug-in loaded (at the first walk; RedfishPluginCache), one session
// opened. Tests wrap it to watch the sessions.
RedfishSessionFactory redfishSessionFactory(const RedfishSourceSettings& settings,
                                            const RedfishSourceSystem& system);

// The source for "redfish:..." (the whole text). Throws SourceError when the text is not a valid
// Redfish source.
std::unique_ptr<InstrumentationSource> makeRedfishSource(std::string_view text,
                                                         const RedfishSourceSystem& system = {});

class RedfishSource final : public InstrumentationSource {
 public:
  // The deadline of every walk is the timeout from the moment `clock` shows when it starts.
  RedfishSource(std::string name, RedfishSourceSettings settings, RedfishSessionFactory sessions,
                std::shared_ptr<const Clock> clock = steadyClock());

  std::string name() const override { return name_; }

  // Walks the service afresh (RedfishWalk.h): one node per chassis and drive that reports a
  // light. Every problem the walk meets is one line in the log at level 6000, and so is every
  // walk with insecure=yes. Throws SourceError when the source cannot be used or the service
  // root or the Chassis collection cannot be read.
  std::vector<InstrumentationNode> readNodes() const override;

 private:
  std::string name_;
  RedfishSourceSettings settings_;
  RedfishSessionFactory sessions_;
  std::shared_ptr<const Clock> clock_;
};

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_REDFISH_REDFISHSOURCE_H
