#include "BlackboxFixture.h"

#include <cstdlib>
#include <sstream>
#include <stdexcept>
#include <string>

namespace blackbox {

testsupport::LogCapture& providerLog() {
  static testsupport::LogCapture capture(0);
  return capture;
}

cmpihost::ProviderLibrary& providerLibrary() {
  providerLog();
  static cmpihost::ProviderLibrary library(BLUELIGHT_PROVIDER_LIBRARY);
  return library;
}

BlackboxTest::BlackboxTest()
    : systemName_("KESTA_SYSTEM_NAME", kSystemName),
      language_("KESTA_LANGUAGE", std::string("en")) {
  providerLibrary();
  useTree({});
  useComputerSystems({kSystemName});
  clearLog();
}

BlackboxTest::~BlackboxTest() = default;

void BlackboxTest::useTree(const std::vector<testsupport::Node>& nodes) {
  testsupport::writeTree(tree_, nodes);
  source_.emplace("KESTA_INSTRUMENTATION", "file:" + tree_ + otherSources());
}

std::string BlackboxTest::otherSources() {
  // The suites run a second time with the tree as the first of several sources that give no
  // light (tests/blackbox/CMakeLists.txt): read in one walk, they must change no result.
  // BLUELIGHT_BLACKBOX_OTHER_SOURCES_FILES names files separated by ':', each holding one line
  // of sources. The Redfish service's file is written only when its fixture has started the mock
  // (its port is known then), so the files are read when the test runs.
  static const std::string others = []() -> std::string {
    const char* files = std::getenv("BLUELIGHT_BLACKBOX_OTHER_SOURCES_FILES");
    std::string list;
    std::istringstream names(files != nullptr ? files : "");
    for (std::string file; std::getline(names, file, ':');) {
      if (file.empty()) continue;
      const std::string text = testsupport::readFile(file);
      if (text.empty()) throw std::runtime_error("no sources in " + file);
      list += ";" + text.substr(0, text.find('\n'));
    }
    return list;
  }();
  return others;
}

bool BlackboxTest::withOtherSources() { return !otherSources().empty(); }

void BlackboxTest::useComputerSystems(const std::vector<std::string>& names) {
  std::vector<cmpihost::InstanceValue> systems;
  for (const std::string& name : names) {
    cmpihost::InstanceValue system(computerSystemPath(name));
    system.set("CreationClassName", cmpihost::Value("KESTA_ComputerSystem"));
    system.set("Name", cmpihost::Value(name));
    systems.push_back(system);
  }
  broker_.setUpcallInstances("KESTA_ComputerSystem", systems);
}

CMPIInstanceMI* BlackboxTest::instanceMI(const std::string& provider) {
  cmpihost::Request request(broker_);
  cmpihost::InstanceMILoad load =
      cmpihost::createInstanceMI(providerLibrary(), provider, broker_, request);
  if (!load.ok()) throw std::runtime_error(load.error);
  return load.mi;
}

CMPIAssociationMI* BlackboxTest::associationMI(const std::string& provider) {
  cmpihost::Request request(broker_);
  cmpihost::AssociationMILoad load =
      cmpihost::createAssociationMI(providerLibrary(), provider, broker_, request);
  if (!load.ok()) throw std::runtime_error(load.error);
  return load.mi;
}

cmpihost::ObjectPathValue BlackboxTest::classPath(const std::string& className,
                                                  const std::string& nameSpace) {
  return cmpihost::ObjectPathValue(nameSpace, className);
}

cmpihost::ObjectPathValue BlackboxTest::lightPath(const std::string& deviceID,
                                                  const std::string& nameSpace) {
  cmpihost::ObjectPathValue path(nameSpace, "KESTA_BlueLight");
  path.addKey("CreationClassName", cmpihost::Value("KESTA_BlueLight"));
  path.addKey("DeviceID", cmpihost::Value(deviceID));
  path.addKey("SystemCreationClassName", cmpihost::Value("KESTA_ComputerSystem"));
  path.addKey("SystemName", cmpihost::Value(kSystemName));
  return path;
}

cmpihost::ObjectPathValue BlackboxTest::capabilitiesPath(const std::string& nameSpace) {
  cmpihost::ObjectPathValue path(nameSpace, "KESTA_BlueLightCapabilities");
  path.addKey("InstanceID", cmpihost::Value("KESTA:BlueLightCapabilities1"));
  return path;
}

cmpihost::ObjectPathValue BlackboxTest::computerSystemPath(const std::string& name,
                                                           const std::string& nameSpace) {
  cmpihost::ObjectPathValue path(nameSpace, "KESTA_ComputerSystem");
  path.addKey("CreationClassName", cmpihost::Value("KESTA_ComputerSystem"));
  path.addKey("Name", cmpihost::Value(name));
  return path;
}

std::vector<std::string> BlackboxTest::log(const std::string& category,
                                           const std::string& kind) const {
  std::vector<std::string> texts;
  for (const std::string& text : providerLog().texts(category, kind)) {
    texts.push_back(testsupport::maskLineNumbers(testsupport::maskPointers(text)));
  }
  return texts;
}

std::vector<testsupport::LogLine> BlackboxTest::logLines() const { return providerLog().lines(); }

void BlackboxTest::clearLog() { providerLog().clear(); }

std::vector<std::string> BlackboxTest::traces(const cmpihost::Outcome& outcome) {
  std::vector<std::string> texts;
  for (const cmpihost::TraceRecord& record : outcome.traces) {
    texts.push_back(std::to_string(record.level) + " " + record.component.value_or("(null)") +
                    ": " + record.text.value_or("(null)"));
  }
  return texts;
}

std::vector<std::string> BlackboxTest::logAtBothLevels(const std::string& category) const {
  std::vector<std::string> logged = log(category, "LOG");
  EXPECT_EQ(log(category, "TRACE"), logged) << category;
  return logged;
}

void BlackboxTest::forEveryCreatingFault(
    const std::vector<std::function<cmpihost::Outcome()>>& operations,
    const std::function<void(const cmpihost::Outcome&)>& check) {
  using cmpihost::Fault;
  for (std::size_t op = 0; op < operations.size(); ++op) {
    broker_.clearFaults();
    broker_.resetCreationCounts();
    operations[op]();
    const cmpihost::CreationCounts counts = broker_.creationCounts();
    for (cmpihost::CreatingFunction function : cmpihost::allCreatingFunctions()) {
      for (std::uint64_t nth = 1; nth <= counts[function]; ++nth) {
        for (const Fault& fault :
             {Fault::nullResult(function, nth), Fault::nullHandle(function, nth),
              Fault::errorStatus(function, nth)}) {
          SCOPED_TRACE("operation " + std::to_string(op) + ", " +
                       ::testing::PrintToString(fault.kind) + " on " +
                       ::testing::PrintToString(function) + " #" + std::to_string(nth));
          broker_.clearFaults();
          broker_.armFault(fault);
          check(operations[op]());
        }
      }
    }
  }
  broker_.clearFaults();
}

std::vector<std::string> handOverKinds(const cmpihost::Outcome& outcome) {
  std::vector<std::string> texts;
  for (const cmpihost::ResultEvent& event : outcome.results) {
    texts.push_back(std::string(cmpihost::toString(event.kind)) + " " +
                    cmpihost::toString(event.state));
  }
  return texts;
}

std::vector<std::string> propertyTexts(const cmpihost::InstanceValue& instance) {
  std::vector<std::string> texts;
  for (const cmpihost::Property& property : instance.properties()) {
    texts.push_back(property.name + " = " + property.value.toString());
  }
  return texts;
}

std::string callText(const cmpihost::CallRecord& call) {
  std::string text = call.table + "." + call.function + "(";
  for (std::size_t i = 0; i < call.args.size(); ++i) {
    text += (i == 0 ? "" : ", ") + call.args[i];
  }
  return text + ")";
}

std::vector<std::string> callTexts(const cmpihost::Outcome& outcome, const std::string& function) {
  std::vector<std::string> texts;
  for (const cmpihost::CallRecord& call : outcome.calls) {
    if (call.function == function) texts.push_back(callText(call));
  }
  return texts;
}

std::string entering(const std::string& function, const std::string& file,
                     const std::string& list) {
  return "ENTERING: " + function + "() in " + file + " [Line: N],Parameters List: " + list;
}

std::string exiting(const std::string& function, const std::string& file, const std::string& list) {
  return "EXITING: " + function + "() in " + file + " [Line: N],Parameters List: " + list;
}

}  // namespace blackbox
