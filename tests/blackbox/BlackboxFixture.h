// The provider library as an object manager sees it: loaded once per test program with dlopen
// into the in-process host, its MIs created through the exported factory functions, and its log
// written to a file that the tests read back.
#ifndef BLUELIGHT_TESTS_BLACKBOXFIXTURE_H
#define BLUELIGHT_TESTS_BLACKBOXFIXTURE_H

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "TestSupport.h"
#include "cmpihost/cmpihost.h"

namespace blackbox {

inline const std::string kSystemName = "bbhost.example";
inline const std::string kNameSpace = "root/cimv2";

// Provider names and the classes they serve.
inline const std::string kLightProvider = "BlueLightProfileProvider";
inline const std::string kCapabilitiesProvider = "BlueLightCapabilitiesProvider";
inline const std::string kElementCapabilitiesProvider = "BlueLightElementCapabilitiesProvider";
inline const std::string kSystemDeviceProvider = "BlueLightSystemDeviceProvider";

// The log of the loaded library. Its logger reads VNLOG_SINK once, at its first line, so the
// capture is made before the library is loaded and lives as long as the program.
testsupport::LogCapture& providerLog();
// The library, loaded on first use and kept until the program ends.
cmpihost::ProviderLibrary& providerLibrary();

// One test: a fresh broker, the four MIs created on it (in a request, as an object manager
// does), a fixed system name, and a tree of lights.
class BlackboxTest : public ::testing::Test {
 public:
  BlackboxTest(const BlackboxTest&) = delete;
  BlackboxTest& operator=(const BlackboxTest&) = delete;
  ~BlackboxTest() override;

 protected:
  BlackboxTest();

  // Points the instrumentation at a tree of `nodes` (read at every operation), followed by the
  // other sources of the run, if any.
  void useTree(const std::vector<testsupport::Node>& nodes);
  // The sources the run reads after the tree, with a leading ";": the one line of each file
  // BLUELIGHT_BLACKBOX_OTHER_SOURCES_FILES names (':'-separated); empty in the ordinary run.
  static std::string otherSources();
  // True in the run with other sources.
  static bool withOtherSources();
  // Answers the KESTA_ComputerSystem up-calls with computer systems of these names.
  void useComputerSystems(const std::vector<std::string>& names);

  CMPIInstanceMI* instanceMI(const std::string& provider);
  CMPIAssociationMI* associationMI(const std::string& provider);

  // A key-less path of a class, the path of one light, of the capabilities record, of a computer
  // system, as a client would send them.
  static cmpihost::ObjectPathValue classPath(const std::string& className,
                                             const std::string& nameSpace = kNameSpace);
  static cmpihost::ObjectPathValue lightPath(const std::string& deviceID,
                                             const std::string& nameSpace = kNameSpace);
  static cmpihost::ObjectPathValue capabilitiesPath(const std::string& nameSpace = kNameSpace);
  static cmpihost::ObjectPathValue computerSystemPath(const std::string& name,
                                                      const std::string& nameSpace = kNameSpace);

  // The provider's log lines of a category and kind since the test began (or the last
  // clearLog()), with addresses written as PTR and line numbers as N.
  std::vector<std::string> log(const std::string& category, const std::string& kind = "LOG") const;
  // Every line of the provider's log since the test began, unmasked.
  std::vector<testsupport::LogLine> logLines() const;
  void clearLog();

  // The broker traces of an operation, each as "<level> <component>: <text>".
  static std::vector<std::string> traces(const cmpihost::Outcome& outcome);

  // The lines of a category, which must have reached the log level and the trace level alike;
  // returned once, as logged.
  std::vector<std::string> logAtBothLevels(const std::string& category) const;

  // Runs each operation once without faults to count its creating broker calls, then again with
  // each of those calls failing in turn (null result, null handle, error status), and hands
  // every faulted outcome to `check`.
  void forEveryCreatingFault(const std::vector<std::function<cmpihost::Outcome()>>& operations,
                             const std::function<void(const cmpihost::Outcome&)>& check);

  testsupport::TempDir dir_;
  std::string tree_ = dir_.file("tree.json");
  testsupport::ScopedEnv systemName_;
  testsupport::ScopedEnv language_;
  std::optional<testsupport::ScopedEnv> source_;
  cmpihost::Broker broker_;
};

// The entry or exit line of an operation as the tests compare it.
std::string entering(const std::string& function, const std::string& file, const std::string& list);
std::string exiting(const std::string& function, const std::string& file, const std::string& list);

// What an operation handed over, each as "<kind> <state>", e.g. "Instance Valid".
std::vector<std::string> handOverKinds(const cmpihost::Outcome& outcome);
// The properties of an instance as "Name = value", in the order they were set.
std::vector<std::string> propertyTexts(const cmpihost::InstanceValue& instance);
// A recorded call as "Table.function(args)", without the request it was made in.
std::string callText(const cmpihost::CallRecord& call);
// The recorded calls of one function, as callText() writes them.
std::vector<std::string> callTexts(const cmpihost::Outcome& outcome, const std::string& function);

}  // namespace blackbox

#endif  // BLUELIGHT_TESTS_BLACKBOXFIXTURE_H
