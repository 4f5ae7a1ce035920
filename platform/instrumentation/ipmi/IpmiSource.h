// The IPMI sources: the chassis identify light of a BMC as one blue-light node.
//
//   ipmi:[<device>][?<options>]                                  in-band, default /dev/ipmi0
//   ipmi-lan:<host>[:<port>]?credentials=<file>[&<options>]      RMCP+, default port 623
//
// <options> are name=value pairs joined by '&':
//   description=<text>          the node's description (default "Blue Light")
//   timeout=<seconds>|<n>ms     the longest a read may take (default 1 s; 10 ms to 60 s)
//   on=alternating|steady       how a light that is on is reported (default alternating)
//   credentials=<file>          ipmi-lan only, required: the account (see IpmiCredentials.h)
// Values may use %XX escapes (for '&', '%' or any byte). An IPv6 host is written in brackets:
// ipmi-lan:[fd00::5]:623?credentials=...
#ifndef KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMISOURCE_H
#define KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMISOURCE_H

#include <chrono>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/ipmi/IpmiDeviceTransport.h"
#include "instrumentation/ipmi/IpmiIdentify.h"
#include "instrumentation/ipmi/IpmiTransport.h"
#include "os/Clock.h"
#include "os/FileSystem.h"

namespace Kesta {
namespace platform {

constexpr const char* kIpmiDefaultDescription = "Blue Light";
constexpr unsigned int kIpmiLanDefaultPort = 623;
constexpr std::chrono::milliseconds kIpmiDefaultTimeout{1000};
constexpr std::chrono::milliseconds kIpmiShortestTimeout{10};
constexpr std::chrono::milliseconds kIpmiLongestTimeout{60000};

// The options both kinds of IPMI source share.
struct IpmiSourceOptions {
  std::string description = kIpmiDefaultDescription;
  std::chrono::milliseconds timeout = kIpmiDefaultTimeout;
  OnReport onReport = OnReport::Alternating;
};

// "ipmi:" parsed.
struct IpmiDeviceSourceSettings {
  std::string device;
  IpmiSourceOptions options;
};

// "ipmi-lan:" parsed.
struct IpmiLanSourceSettings {
  std::string host;  // as written, lower case; IPv6 without the brackets
  unsigned int port = kIpmiLanDefaultPort;
  std::string credentialsFile;
  IpmiSourceOptions options;
};

// Parse the text after the scheme ("ipmi:" or "ipmi-lan:"). Throw SourceError with the reason.
IpmiDeviceSourceSettings parseIpmiDeviceSource(std::string_view rest);
IpmiLanSourceSettings parseIpmiLanSource(std::string_view rest);

// The node path that names a BMC: "ipmi:/dev/ipmi0", "ipmi-lan:bmc.example:623",
// "ipmi-lan:[fd00::5]:623". Stable for a given source text, so the light keeps its DeviceID.
std::string ipmiDevicePath(const IpmiDeviceSourceSettings& settings);
std::string ipmiLanPath(const IpmiLanSourceSettings& settings);

// What an IPMI source uses of the operating system: the clock its deadlines are measured by, the
// file system the credentials file is read from, and the IPMI device's system calls. The real
// ones unless a test hands in its own.
struct IpmiSourceSystem {
  std::shared_ptr<const Clock> clock = steadyClock();
  std::shared_ptr<FileSystem> files = systemFileSystem();
  std::shared_ptr<IpmiDeviceOs> device = systemIpmiDeviceOs();
};

// The source for "ipmi:..." or "ipmi-lan:..." (the whole text). Throws SourceError when the text
// is not a valid IPMI source.
std::unique_ptr<InstrumentationSource> makeIpmiSource(std::string_view text,
                                                      const IpmiSourceSystem& system = {});

class IpmiSource final : public InstrumentationSource {
 public:
  // Makes the transport for one read; may throw SourceError (credentials that cannot be used, a
  // network transport that is not installed).
  using TransportFactory = std::function<std::unique_ptr<IpmiTransport>()>;

  // The deadline of every read is the timeout from the moment `clock` shows when it starts.
  IpmiSource(std::string name, std::string path, IpmiSourceOptions options,
             TransportFactory transport, std::shared_ptr<const Clock> clock = steadyClock());

  std::string name() const override { return name_; }

  // Always exactly one node (see identifyNode): a BMC that does not answer within the timeout,
  // answers with an error or answers too briefly gives status 21 and one line in the log at
  // level 6000 naming the source and the reason. Throws SourceError only when the source cannot
  // be used at all (the transport factory failed).
  std::vector<InstrumentationNode> readNodes() const override;

 private:
  std::string name_;
  std::string path_;
  IpmiSourceOptions options_;
  TransportFactory transport_;
  std::shared_ptr<const Clock> clock_;
};

// The transports makeIpmiSource gives its sources, one for every read: the device of "ipmi:",
// or the network transport of "ipmi-lan:" with the credentials read afresh. Tests wrap them to
// see what a source asks of its transport.
IpmiSource::TransportFactory ipmiDeviceTransportFactory(const IpmiDeviceSourceSettings& settings,
                                                        const IpmiSourceSystem& system);
IpmiSource::TransportFactory ipmiLanTransportFactory(const IpmiLanSourceSettings& settings,
                                                     const IpmiSourceSystem& system);

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMISOURCE_H
