// The network transport of "ipmi-lan:" sources: RMCP+ through the plug-in bluelight-ipmi-lan.so
// (see IpmiLanPluginApi.h), opened with dlopen the first time a network source is read.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMILANTRANSPORT_H
#define KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMILANTRANSPORT_H

#include <memory>
#include <string>
#include <vector>

#include "instrumentation/ipmi-lan-plugin/IpmiLanPluginApi.h"
#include "instrumentation/ipmi/IpmiCredentials.h"
#include "instrumentation/ipmi/IpmiTransport.h"
#include "os/Clock.h"

namespace Kesta {
namespace platform {

struct IpmiLanTarget {
  std::string host;  // name or address; IPv6 without brackets
  unsigned int port = 623;
  IpmiCredentials credentials;
};

// Where the plug-in is looked for, in order, for a binary (the provider library, or the program
// the platform is linked into) in `binaryDirectory`:
//   <binaryDirectory>/bluelightprofileprovider/bluelight-ipmi-lan.so
//   <binaryDirectory>/../lib/bluelightprofileprovider/bluelight-ipmi-lan.so  (build-tree programs)
//   <CMAKE_INSTALL_FULL_LIBDIR>/bluelightprofileprovider/bluelight-ipmi-lan.so
std::vector<std::string> ipmiLanPluginCandidates(const std::string& binaryDirectory);

// The plug-in's entry points. It is loaded once per process and never unloaded (its thread keeps
// the sessions). Throws SourceError, saying where it looked, when it is missing or unusable;
// a later call tries again, so installing it takes effect without a restart.
const BluelightIpmiLanApi& ipmiLanPlugin();

class IpmiLanTransport final : public IpmiTransport {
 public:
  // Loads the plug-in (throws SourceError when it cannot). The deadline is measured by `clock`.
  explicit IpmiLanTransport(IpmiLanTarget target,
                            std::shared_ptr<const Clock> clock = steadyClock());

  // Hands the plug-in the time left until the deadline; nothing at all when none is left.
  IpmiResponse transact(const IpmiRequest& request, IpmiClock::time_point deadline) const override;

 private:
  IpmiLanTarget target_;
  std::shared_ptr<const Clock> clock_;
  const BluelightIpmiLanApi* api_;
};

}  // namespace platform
}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_IPMI_IPMILANTRANSPORT_H
