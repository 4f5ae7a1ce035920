#include "instrumentation/redfish/RedfishTransport.h"

#include <algorithm>
#include <limits>
#include <mutex>

#include "instrumentation/PluginLoader.h"
#include "instrumentation/SourceError.h"
#include "instrumentation/redfish/RedfishBuildConfig.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

constexpr unsigned int kHttpsPort = 443;

bool isComplete(const void* table) {
  const auto* api = static_cast<const BluelightRedfishApi*>(table);
  return api->open != nullptr && api->get != nullptr && api->connections != nullptr &&
         api->close != nullptr;
}

PluginDescription redfishPluginDescription() {
  PluginDescription plugin;
  plugin.file = BLUELIGHT_REDFISH_PLUGIN_FILE;
  plugin.folder = BLUELIGHT_REDFISH_PLUGIN_FOLDER;
  plugin.installDir = BLUELIGHT_REDFISH_PLUGIN_INSTALL_DIR;
  plugin.built = BLUELIGHT_REDFISH_PLUGIN_BUILT != 0;
  plugin.entryPoint = BLUELIGHT_REDFISH_ENTRY_POINT;
  plugin.abiVersion = BLUELIGHT_REDFISH_ABI_VERSION;
  plugin.what = "the Redfish transport";
  plugin.runtimeHint = "it needs libcurl: Debian package libcurl4";
  plugin.notBuilt =
      "this build has no transport for redfish: sources (libcurl was not found when it was "
      "configured)";
  plugin.complete = isComplete;
  return plugin;
}

int appendBody(void* context, const char* bytes, unsigned long length) {
  auto* body = static_cast<std::string*>(context);
  if (body->size() + length > kRedfishAnswerLimit) {
    return 1;  // the plug-in enforces the limit too; this only keeps the copy bounded
  }
  body->append(bytes, length);
  return 0;
}

// A location as a log line may show it: printable, and not longer than a line should be.
std::string shownLocation(std::string_view location) {
  constexpr std::size_t kShown = 160;
  if (location.size() > kShown) {
    return printable(location.substr(0, kShown)) + "...";
  }
  return printable(location);
}

class PluginSession final : public RedfishSession {
 public:
  PluginSession(const BluelightRedfishApi& api, BluelightRedfishSession* session, std::string host,
                unsigned int port, std::shared_ptr<const Clock> clock)
      : api_(api),
        session_(session),
        host_(std::move(host)),
        port_(port),
        clock_(std::move(clock)) {}
  ~PluginSession() override { api_.close(session_); }
  PluginSession(const PluginSession&) = delete;
  PluginSession& operator=(const PluginSession&) = delete;

  RedfishAnswer get(const std::string& path, Clock::time_point deadline) override {
    std::string current = path;
    for (unsigned int redirects = 0;; ++redirects) {
      const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - clock_->now());
      if (left.count() <= 0) {
        return RedfishAnswer::timedOut("no answer");
      }
      const auto milliseconds = static_cast<unsigned int>(
          std::min<long long>(left.count(), std::numeric_limits<unsigned int>::max()));
      std::string body;
      BluelightRedfishResult result = {};
      api_.get(session_, current.c_str(), milliseconds, kRedfishAnswerLimit, appendBody, &body,
               &result);
      result.reason[BLUELIGHT_REDFISH_MAX_REASON - 1] = '\0';
      result.location[BLUELIGHT_REDFISH_MAX_LOCATION - 1] = '\0';
      const std::string reason = printable(result.reason);
      switch (result.outcome) {
        case BLUELIGHT_REDFISH_ANSWERED:
          break;
        case BLUELIGHT_REDFISH_TIMED_OUT:
          return RedfishAnswer::timedOut("no answer");
        case BLUELIGHT_REDFISH_TOO_LARGE:
          return RedfishAnswer::refused("the answer is larger than " +
                                        std::to_string(kRedfishAnswerLimit / 1024) +
                                        " KiB; it is not read");
        case BLUELIGHT_REDFISH_CERTIFICATE:
          return RedfishAnswer::lost("the service's certificate is not accepted: " + reason);
        case BLUELIGHT_REDFISH_UNREACHABLE:
          return RedfishAnswer::lost("no connection to the service: " + reason);
        default:
          return RedfishAnswer::lost(reason.empty() ? "the request failed" : reason);
      }
      const unsigned int status = result.httpStatus;
      if (status >= 200 && status < 300) {
        return RedfishAnswer::ok(std::move(body));
      }
      const bool redirect =
          status == 301 || status == 302 || status == 303 || status == 307 || status == 308;
      if (!redirect || result.location[0] == '\0') {
        return RedfishAnswer::refused(httpStatusText(status));
      }
      RedirectTarget target = sameServiceRedirect(result.location, host_, port_);
      if (target.path.empty()) {
        return RedfishAnswer::refused("redirected (HTTP status " + std::to_string(status) +
                                      ") to " + shownLocation(result.location) + ", " +
                                      target.problem + "; not followed");
      }
      if (redirects == kRedfishMaxRedirects) {
        return RedfishAnswer::refused("redirected more than " +
                                      std::to_string(kRedfishMaxRedirects) +
                                      " times in a row; not followed further");
      }
      current = std::move(target.path);
    }
  }

  unsigned int connections() const override { return api_.connections(session_); }

 private:
  const BluelightRedfishApi& api_;
  BluelightRedfishSession* session_;
  std::string host_;
  unsigned int port_;
  std::shared_ptr<const Clock> clock_;
};

}  // namespace

std::vector<std::string> redfishPluginCandidates(const std::string& binaryDirectory) {
  return pluginCandidates(binaryDirectory, redfishPluginDescription());
}

const BluelightRedfishApi& redfishPlugin() {
  return *static_cast<const BluelightRedfishApi*>(loadPlugin(redfishPluginDescription()));
}

const BluelightRedfishApi& RedfishPluginCache::get() {
  std::lock_guard<std::mutex> lock(mutex_);
  if (api_ == nullptr) {
    api_ = &redfishPlugin();
  }
  return *api_;
}

RedirectTarget sameServiceRedirect(std::string_view location, const std::string& host,
                                   unsigned int port) {
  RedirectTarget target;
  const std::string_view scheme = "https://";
  if (location.size() < scheme.size() ||
      !equalsIgnoringCase(location.substr(0, scheme.size()), scheme)) {
    target.problem = "which is not an https:// URL";
    return target;
  }
  location.remove_prefix(scheme.size());
  const std::string_view::size_type end = location.find_first_of("/?#");
  const std::string_view authority = location.substr(0, end);
  std::string_view rest = end == std::string_view::npos ? std::string_view() : location.substr(end);
  if (authority.find('@') != std::string_view::npos) {
    target.problem = "which names an account";
    return target;
  }
  std::string_view otherHost;
  std::string_view otherPort;
  if (!authority.empty() && authority.front() == '[') {
    const std::string_view::size_type close = authority.find(']');
    if (close == std::string_view::npos) {
      target.problem = "which is not a URL";
      return target;
    }
    otherHost = authority.substr(1, close - 1);
    const std::string_view after = authority.substr(close + 1);
    if (!after.empty() && after.front() != ':') {
      target.problem = "which is not a URL";
      return target;
    }
    otherPort = after.empty() ? std::string_view() : after.substr(1);
  } else {
    const std::string_view::size_type colon = authority.find(':');
    otherHost = authority.substr(0, colon);
    otherPort = colon == std::string_view::npos ? std::string_view() : authority.substr(colon + 1);
  }
  unsigned int otherPortNumber = kHttpsPort;
  if (!otherPort.empty()) {
    if (otherPort.size() > 5 || !std::all_of(otherPort.begin(), otherPort.end(),
                                             [](char c) { return c >= '0' && c <= '9'; })) {
      target.problem = "which is not a URL";
      return target;
    }
    otherPortNumber = static_cast<unsigned int>(std::stoul(std::string(otherPort)));
  }
  if (!equalsIgnoringCase(otherHost, host) || otherPortNumber != port) {
    target.problem = "another host or port than the source names";
    return target;
  }
  // A fragment is the client's business and never sent.
  rest = rest.substr(0, rest.find('#'));
  if (rest.empty() || rest.front() != '/') {
    target.path = "/" + std::string(rest);
  } else {
    target.path = std::string(rest);
  }
  if (std::any_of(target.path.begin(), target.path.end(), [](char c) {
        return static_cast<unsigned char>(c) <= 0x20 || static_cast<unsigned char>(c) >= 0x7f;
      })) {
    target.path.clear();
    target.problem = "which is not a URL";
  }
  return target;
}

std::string httpStatusText(unsigned int status) {
  std::string text = "HTTP status " + std::to_string(status);
  switch (status) {
    case 400:
      return text + " (Bad Request)";
    case 401:
      return text +
             " (Unauthorized): the service does not accept the account of the credentials "
             "file";
    case 403:
      return text + " (Forbidden): the account may not read it";
    case 404:
      return text + " (Not Found)";
    case 405:
      return text + " (Method Not Allowed)";
    case 500:
      return text + " (Internal Server Error)";
    case 501:
      return text + " (Not Implemented)";
    case 502:
      return text + " (Bad Gateway)";
    case 503:
      return text + " (Service Unavailable)";
    case 504:
      return text + " (Gateway Timeout)";
    default:
      return text;
  }
}

std::unique_ptr<RedfishSession> openRedfishSession(const BluelightRedfishApi& api,
                                                   const RedfishTarget& target,
                                                   std::shared_ptr<const Clock> clock) {
  BluelightRedfishService service = {};
  service.host = target.host.c_str();
  service.port = target.port;
  service.user = target.credentials.user.data();
  service.userLength = static_cast<unsigned int>(target.credentials.user.size());
  service.password = target.credentials.password.data();
  service.passwordLength = static_cast<unsigned int>(target.credentials.password.size());
  service.caFile = target.caFile.empty() ? nullptr : target.caFile.c_str();
  service.verify = target.verify ? 1 : 0;
  char reason[BLUELIGHT_REDFISH_MAX_REASON] = {};
  BluelightRedfishSession* session = api.open(&service, reason, sizeof reason);
  if (session == nullptr) {
    reason[sizeof reason - 1] = '\0';
    throw SourceError("the Redfish transport cannot open a session: " + printable(reason));
  }
  return std::make_unique<PluginSession>(api, session, target.host, target.port, std::move(clock));
}

}  // namespace platform
}  // namespace Kesta
