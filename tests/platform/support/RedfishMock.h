// A Redfish service on the loopback interface for the tests of the redfish: source: the mock of
// tests/redfish-mock/redfish_mock.py, started by python3 on a free port (the mock picks it and
// writes it to a file), with the certificates the tests make with the openssl command. The mock
// is always stopped by its process id when the object goes - also when a test fails or throws -
// and it is asked to die with the test process should that be killed. python3, openssl and the
// transport plug-in are required when the build is configured, so these tests always run.
#ifndef BLUELIGHT_TESTS_PLATFORM_REDFISHMOCK_H
#define BLUELIGHT_TESTS_PLATFORM_REDFISHMOCK_H

#include <sys/types.h>

#include <optional>
#include <string>
#include <vector>

#include "TestSupport.h"

namespace redfish_test {

// The certificates of the tests (see "pki" in redfish_mock.py), made once a week per build tree
// and shared by the test processes; they are valid for 30 days.
struct Pki {
  std::string directory;
  std::string authority;       // ca.pem: the authority the tests trust (ca=)
  std::string otherAuthority;  // other-ca.pem
  std::string key;             // server.key, the key of every server certificate
  std::string server;          // server.pem: 127.0.0.1, ::1 and localhost, by the authority
  std::string otherServer;     // other-server.pem: the same names, by the other authority
  std::string wrongName;       // wrong-name.pem: elsewhere.test only, by the authority
};
const Pki& pki();

// The path of a service of tests/redfish-mock/services, e.g. "rack-server".
std::string serviceFile(const std::string& service);

struct MockOptions {
  std::string service = "rack-server";
  std::string certificate;              // empty: pki().server
  std::vector<std::string> behaviours;  // "<path>=<kind>", see redfish_mock.py
};

class RedfishMock {
 public:
  // Starts the mock and waits until it says it listens; throws std::runtime_error with its output
  // when it ends before that.
  explicit RedfishMock(const MockOptions& options = {});
  ~RedfishMock();
  RedfishMock(const RedfishMock&) = delete;
  RedfishMock& operator=(const RedfishMock&) = delete;

  // Stops the mock (SIGKILL) and reaps it. Idempotent.
  void stop();

  unsigned int port() const { return port_; }
  pid_t pid() const { return pid_; }
  // The credentials file (mode 0600) of the account the mock accepts.
  const std::string& credentials() const { return credentials_; }
  // A credentials file (mode 0600) with a password the mock refuses.
  const std::string& wrongCredentials() const { return wrongCredentials_; }

  // "redfish:https://127.0.0.1:<port>?credentials=<file>&ca=<authority>", then "&" and `options`
  // when given.
  std::string sourceText(const std::string& options = "") const;
  // The same without ca= (for insecure=yes and the system's authorities).
  std::string sourceTextWithoutCa(const std::string& options = "") const;

  // The mock's events so far: "connect", "handshake-failed <why>", "<METHOD> <path> <status>".
  std::vector<std::string> events() const;
  // How many TLS handshakes the mock completed.
  std::size_t connections() const;
  // The requests, "<METHOD> <path> <status>", in order.
  std::vector<std::string> requests() const;
  // The mock's standard output and error so far.
  std::string output() const;

 private:
  testsupport::TempDir dir_;
  std::string credentials_;
  std::string wrongCredentials_;
  std::string eventsFile_;
  std::string outputFile_;
  unsigned int port_ = 0;
  pid_t pid_ = -1;
};

// Writes `text` to `file` with mode 0600.
void writePrivateFile(const std::string& file, const std::string& text);

}  // namespace redfish_test

#endif  // BLUELIGHT_TESTS_PLATFORM_REDFISHMOCK_H
