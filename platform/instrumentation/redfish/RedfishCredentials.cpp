#include "instrumentation/redfish/RedfishCredentials.h"

#include "instrumentation/CredentialsFile.h"

namespace Kesta {
namespace platform {

RedfishCredentials::~RedfishCredentials() {
  wipe(user);
  wipe(password);
}

RedfishCredentials parseRedfishCredentials(std::string_view text, const std::string& file) {
  RedfishCredentials credentials;
  bool haveUser = false;
  bool havePassword = false;
  forEachCredentialsLine(text, file, [&](const CredentialsLine& line) {
    if (line.name == "user") {
      if (line.value.empty()) {
        refuseCredentialsFile(file, credentialsLineText(line.number) + ": the user name is empty");
      }
      if (line.value.size() > kRedfishUserMax) {
        refuseCredentialsFile(
            file, credentialsLineText(line.number) + ": the user name is longer than 256 bytes");
      }
      // Basic authentication sends "<user>:<password>", so the first ':' ends the user name.
      if (line.value.find(':') != std::string_view::npos) {
        refuseCredentialsFile(file, credentialsLineText(line.number) +
                                        ": the user name holds a ':', which HTTP Basic "
                                        "authentication cannot carry");
      }
      credentials.user.assign(line.value.data(), line.value.size());
      haveUser = true;
    } else if (line.name == "password") {
      if (line.value.size() > kRedfishPasswordMax) {
        refuseCredentialsFile(
            file, credentialsLineText(line.number) + ": the password is longer than 256 bytes");
      }
      credentials.password.assign(line.value.data(), line.value.size());
      havePassword = true;
    } else {
      // The name is not shown: a password written where the name belongs would reach the log.
      refuseCredentialsFile(
          file, credentialsLineText(line.number) + ": unknown name (expected user or password)");
    }
  });
  if (!haveUser) {
    refuseCredentialsFile(file, "has no \"user = ...\" line");
  }
  if (!havePassword) {
    refuseCredentialsFile(file, "has no \"password = ...\" line");
  }
  return credentials;
}

RedfishCredentials readRedfishCredentials(const std::string& file, FileSystem& files) {
  RedfishCredentials credentials;
  readCredentialsFile(file, files, [&](std::string_view text) {
    credentials = parseRedfishCredentials(text, file);
  });
  return credentials;
}

}  // namespace platform
}  // namespace Kesta
