#include "instrumentation/redfish/RedfishSource.h"

#include <map>
#include <utility>

#include "instrumentation/SourceError.h"
#include "instrumentation/SourceLog.h"
#include "instrumentation/SourceOptions.h"
#include "instrumentation/redfish/RedfishCredentials.h"
#include "instrumentation/redfish/RedfishTransport.h"
#include "os/FileIo.h"
#include "text/Text.h"

namespace Kesta {
namespace platform {

namespace {

constexpr const char* kScheme = "redfish:";
constexpr const char* kServiceScheme = "https://";

// A file of certificate authorities is read only to see that it can be; the system's own bundle is
// a few hundred kilobytes, so anything far bigger is the wrong file.
constexpr std::size_t kCaFileLimit = std::size_t{16} * 1024 * 1024;

void logLine(const std::string& source, const std::string& text) {
  logSourceProblem(describeSource(source, "") + " " + text);
}

bool parseYesNo(const std::string& name, const std::string& value) {
  if (equalsIgnoringCase(value, "yes")) {
    return true;
  }
  if (equalsIgnoringCase(value, "no")) {
    return false;
  }
  throw SourceError(name + "=" + printable(value) + " must be " + name + "=yes or " + name + "=no");
}

std::string takeFileOption(std::map<std::string, std::string>& options, const std::string& name) {
  const auto found = options.find(name);
  if (found == options.end()) {
    return std::string();
  }
  std::string file = found->second;
  options.erase(found);
  if (file.empty()) {
    throw SourceError(name + "= names no file");
  }
  if (file.front() != '/') {
    throw SourceError(name + "=" + printable(file) + " is not an absolute path");
  }
  return file;
}

// The file of ca= is read by the TLS library when the connection is made; checking it first
// gives a message that names the file and the reason instead of the library's.
void checkCaFile(const std::string& file, FileSystem& files) {
  const ReadResult read = readRegularFile(files, file, kCaFileLimit);
  if (!read.ok()) {
    throw SourceError("the certificate authorities file \"" + printable(file) +
                      "\" (ca=) cannot be read: " + read.reason);
  }
}

}  // namespace

RedfishSourceSettings parseRedfishSource(std::string_view rest) {
  const auto [head, optionText] = splitAtQuestionMark(rest);
  const std::string_view service = kServiceScheme;
  if (head.substr(0, service.size()) != service) {
    if (head.substr(0, 7) == "http://") {
      throw SourceError(
          "a Redfish service is read over https:// only, so that the account is never sent in "
          "clear text");
    }
    throw SourceError(
        "a Redfish service is named by its URL: "
        "redfish:https://<host>[:<port>]?credentials=<file>");
  }
  std::string_view where = head.substr(service.size());
  if (!where.empty() && where.back() == '/') {
    where.remove_suffix(1);
  }
  if (where.find('@') != std::string_view::npos) {
    // Nothing of the text is repeated here: it may hold a password.
    throw SourceError(
        "an account is never written into the source text; it belongs in the credentials file "
        "(credentials=<file>)");
  }
  if (where.find('/') != std::string_view::npos) {
    throw SourceError(
        "the URL names the service only, https://<host>[:<port>]; the walk always starts at " +
        std::string(kRedfishServiceRoot));
  }
  const HostAndPort address =
      parseHostAndPort(where, "redfish:https://", "redfish:https://[fd00::5]:443");
  RedfishSourceSettings settings;
  settings.host = address.host;
  settings.port = address.port.value_or(kRedfishDefaultPort);

  std::map<std::string, std::string> options = parseOptionList(optionText);
  settings.credentialsFile = takeFileOption(options, "credentials");
  settings.caFile = takeFileOption(options, "ca");
  if (auto found = options.find("insecure"); found != options.end()) {
    settings.insecure = parseYesNo("insecure", found->second);
    options.erase(found);
  }
  if (auto found = options.find("drives"); found != options.end()) {
    settings.drives = parseYesNo("drives", found->second);
    options.erase(found);
  }
  if (auto found = options.find("timeout"); found != options.end()) {
    settings.timeout =
        parseTimeoutOption(found->second, kRedfishShortestTimeout, kRedfishLongestTimeout);
    options.erase(found);
  }
  if (auto found = options.find("on"); found != options.end()) {
    settings.onReport = parseOnOption(found->second);
    options.erase(found);
  }
  refuseUnknownOptions(options, "credentials, ca, insecure, drives, timeout or on");
  if (settings.credentialsFile.empty()) {
    throw SourceError(
        "a Redfish service needs credentials=<file>, a file that only its owner can read");
  }
  if (settings.insecure && !settings.caFile.empty()) {
    throw SourceError(
        "ca= and insecure=yes contradict each other: with insecure=yes no certificate is "
        "checked at all");
  }
  return settings;
}

std::string redfishPathPrefix(const RedfishSourceSettings& settings) {
  return std::string(kScheme) + bracketedHost(settings.host) + ":" + std::to_string(settings.port);
}

RedfishSessionFactory redfishSessionFactory(const RedfishSourceSettings& settings,
                                            const RedfishSourceSystem& system) {
  return [settings, files = system.files, clock = system.clock,
          plugin = std::make_shared<RedfishPluginCache>()]() {
    RedfishTarget target;
    target.host = settings.host;
    target.port = settings.port;
    target.credentials = readRedfishCredentials(settings.credentialsFile, *files);
    target.caFile = settings.caFile;
    target.verify = !settings.insecure;
    if (!target.caFile.empty()) {
      checkCaFile(target.caFile, *files);
    }
    return openRedfishSession(plugin->get(), target, clock);
  };
}

std::unique_ptr<InstrumentationSource> makeRedfishSource(std::string_view text,
                                                         const RedfishSourceSystem& system) {
  const std::string_view scheme = kScheme;
  if (text.substr(0, scheme.size()) != scheme) {
    throw SourceError("not a Redfish source (expected redfish:https://<host>)");
  }
  RedfishSourceSettings settings = parseRedfishSource(text.substr(scheme.size()));
  RedfishSessionFactory sessions = redfishSessionFactory(settings, system);
  return std::make_unique<RedfishSource>(std::string(text), std::move(settings),
                                         std::move(sessions), system.clock);
}

RedfishSource::RedfishSource(std::string name, RedfishSourceSettings settings,
                             RedfishSessionFactory sessions, std::shared_ptr<const Clock> clock)
    : name_(std::move(name)),
      settings_(std::move(settings)),
      sessions_(std::move(sessions)),
      clock_(std::move(clock)) {}

std::vector<InstrumentationNode> RedfishSource::readNodes() const {
  // The clock starts before the credentials are read and the transport is loaded, so those
  // count against the same limit as the requests.
  const Clock::time_point deadline = clock_->now() + settings_.timeout;
  if (settings_.insecure) {
    logLine(name_,
            "reads the service without checking its certificate (insecure=yes): whoever can "
            "answer in its place learns the account of the credentials file");
  }
  const std::unique_ptr<RedfishSession> session = sessions_();
  if (session == nullptr) {
    throw SourceError("no session with the service");
  }
  RedfishWalkSettings walk;
  walk.pathPrefix = redfishPathPrefix(settings_);
  walk.drives = settings_.drives;
  walk.onReport = settings_.onReport;
  walk.timeout = settings_.timeout;
  RedfishWalkResult result = walkRedfishService(*session, walk, deadline);
  for (const std::string& problem : result.problems) {
    logLine(name_, problem);
  }
  return std::move(result.nodes);
}

}  // namespace platform
}  // namespace Kesta
