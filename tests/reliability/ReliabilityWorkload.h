// What the reliability gates share: the provider library loaded the way an object manager loads
// it, one fixed world for it to serve (a tree of lights, two computer systems, a log that is
// written but thrown away), the list of read operations the gates run, a rendering of an outcome
// that two runs of one operation can be compared by, and the process figures (resident memory,
// open descriptors, threads) that must stay flat while the provider works.
#ifndef BLUELIGHT_TESTS_RELIABILITYWORKLOAD_H
#define BLUELIGHT_TESTS_RELIABILITYWORKLOAD_H

#include <cstddef>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "TestSupport.h"
#include "cmpihost/cmpihost.h"

namespace reliability {

inline const std::string kLibraryPath = BLUELIGHT_PROVIDER_LIBRARY;
inline const std::string kSystemName = "relhost.example";
inline const std::string kPeerSystemName = "peer.example";
inline const std::string kNameSpace = "root/cimv2";

// Which sanitizer the tests were built with; some figures mean nothing under one (an address
// sanitizer keeps freed memory in quarantine, so resident memory grows by design).
#if defined(__SANITIZE_ADDRESS__)
inline constexpr bool kAddressSanitizer = true;
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
inline constexpr bool kAddressSanitizer = true;
#else
inline constexpr bool kAddressSanitizer = false;
#endif
#else
inline constexpr bool kAddressSanitizer = false;
#endif

#if defined(__SANITIZE_THREAD__)
inline constexpr bool kThreadSanitizer = true;
#elif defined(__has_feature)
#if __has_feature(thread_sanitizer)
inline constexpr bool kThreadSanitizer = true;
#else
inline constexpr bool kThreadSanitizer = false;
#endif
#else
inline constexpr bool kThreadSanitizer = false;
#endif

inline constexpr bool kAnySanitizer = kAddressSanitizer || kThreadSanitizer;

// The environment the provider reads: the system name, the caption language, a tree of four
// lights and one other node, and a log at level 0 into /dev/null (every trace line is formatted
// and written, nothing is kept). Set before the library is loaded, restored when destroyed.
class World {
 public:
  World();
  World(const World&) = delete;
  World& operator=(const World&) = delete;
  ~World() = default;

  // Answers the computer-system up-calls of `broker` with the two systems.
  static void configure(cmpihost::Broker& broker);

 private:
  testsupport::TempDir dir_;
  testsupport::ScopedEnv systemName_;
  testsupport::ScopedEnv language_;
  testsupport::ScopedEnv source_;
  testsupport::ScopedEnv sink_;
  testsupport::ScopedEnv level_;
};

// The six MIs of the library, made by its six factory functions.
struct ProviderMIs {
  CMPIInstanceMI* light = nullptr;
  CMPIInstanceMI* capabilities = nullptr;
  CMPIInstanceMI* elementCapabilities = nullptr;
  CMPIInstanceMI* systemDevice = nullptr;
  CMPIAssociationMI* elementCapabilitiesAssociation = nullptr;
  CMPIAssociationMI* systemDeviceAssociation = nullptr;
};

// Calls the six factory functions in one request; throws std::runtime_error when one fails.
ProviderMIs createMIs(const cmpihost::ProviderLibrary& library, cmpihost::Broker& broker);
// Calls the cleanup of the six MIs; throws std::runtime_error when one does not return OK.
void cleanupMIs(cmpihost::Broker& broker, const ProviderMIs& mis);

// One read operation with fixed arguments.
struct Operation {
  std::string name;
  std::function<cmpihost::Outcome(cmpihost::Broker&, const ProviderMIs&)> run;
};

// Every read operation of the four classes: EnumInstanceNames, EnumInstances (all properties and
// a property list) and GetInstance (of an existing instance; for the lights also of a missing
// one and of a path without keys, which fails);
// Associators, AssociatorNames, References and ReferenceNames of both associations from each of
// their ends. The GetInstance paths of the two associations are taken from their
// EnumInstanceNames, run here once on `mis`.
std::vector<Operation> readOperations(cmpihost::Broker& broker, const ProviderMIs& mis);

// The operations that make one of each of the six MIs work: EnumInstances of the four classes,
// AssociatorNames of the element-capabilities association from a light, References of the
// system-device association from a computer system.
std::vector<Operation> oneOperationPerMI();

// The outcome as text: the status, the number of CMReturnDone calls, every hand-over in order
// (without request ids) and the broker traces. Equal texts mean equal results.
std::string render(const cmpihost::Outcome& outcome);

// The number of objects handed over (instances and paths).
std::size_t handedOver(const cmpihost::Outcome& outcome);

// Figures of this process.
struct ProcessFigures {
  long residentKiB = 0;  // VmRSS
  int openFds = 0;       // entries of /proc/self/fd
  int threads = 0;       // entries of /proc/self/task
};
ProcessFigures measure();

// Whether a file whose name contains `name` is mapped into the process (/proc/self/maps).
bool isMapped(const std::string& name);

// Whether the program runs under valgrind (its preloaded helpers are mapped).
bool underValgrind();

// Seconds since some fixed point, for the figures the gates print.
double now();
// Processor seconds (user and system, all threads) this process has used so far. On a shared
// machine this is the figure that does not depend on the other processes.
double cpuSeconds();

}  // namespace reliability

#endif  // BLUELIGHT_TESTS_RELIABILITYWORKLOAD_H
