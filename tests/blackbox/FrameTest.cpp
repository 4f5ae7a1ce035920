// What an object manager sees of the library before and around the real work of an operation:
// the exported factory functions and their MIs, the operations that do nothing or refuse, and the
// frame every served operation follows (entry line, factory, hand-over, done, exit line).
#include <cmpimacs.h>

#include <string>
#include <vector>

#include "BlackboxFixture.h"

namespace blackbox {
namespace {

using cmpihost::InstanceValue;
using cmpihost::ObjectPathValue;
using cmpihost::Outcome;
using cmpihost::Request;
using cmpihost::StatusValue;
using testsupport::blueLight;
using Texts = std::vector<std::string>;

using InstanceFactory = CMPIInstanceMI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
using AssociationFactory = CMPIAssociationMI* (*)(const CMPIBroker*, const CMPIContext*,
                                                  CMPIStatus*);

struct Exported {
  std::string provider;
  std::string miName;
  std::string className;
};

const std::vector<Exported> kInstanceMIs = {
    {kLightProvider, "instanceBlueLightProfileProvider", "KESTA_BlueLight"},
    {kCapabilitiesProvider, "instanceBlueLightCapabilitiesProvider", "KESTA_BlueLightCapabilities"},
    {kElementCapabilitiesProvider, "instanceBlueLightElementCapabilitiesProvider",
     "KESTA_BlueLightElementCapabilities"},
    {kSystemDeviceProvider, "instanceBlueLightSystemDeviceProvider", "KESTA_BlueLightSystemDevice"},
};

const std::vector<Exported> kAssociationMIs = {
    {kElementCapabilitiesProvider, "associationBlueLightElementCapabilitiesProvider",
     "KESTA_BlueLightElementCapabilities"},
    {kSystemDeviceProvider, "associationBlueLightSystemDeviceProvider",
     "KESTA_BlueLightSystemDevice"},
};

// A status that no operation would leave behind, to see whether a factory touches its rc.
CMPIStatus sentinelStatus() {
  return CMPIStatus{CMPI_RC_ERR_METHOD_NOT_AVAILABLE, reinterpret_cast<CMPIString*>(0x5a5a)};
}

class FrameTest : public BlackboxTest {
 protected:
  InstanceFactory instanceFactory(const std::string& provider) {
    return reinterpret_cast<InstanceFactory>(
        providerLibrary().symbol(cmpihost::instanceMISymbol(provider)));
  }
  AssociationFactory associationFactory(const std::string& provider) {
    return reinterpret_cast<AssociationFactory>(
        providerLibrary().symbol(cmpihost::associationMISymbol(provider)));
  }

  // Calls an operation that must do nothing, and checks that it did nothing.
  void expectNothingDone(const Outcome& outcome, const StatusValue& expected,
                         const std::string& what) {
    SCOPED_TRACE(what);
    EXPECT_EQ(outcome.status, expected);
    EXPECT_EQ(outcome.status.message, std::nullopt);
    EXPECT_TRUE(outcome.results.empty());
    EXPECT_TRUE(outcome.calls.empty());
    EXPECT_TRUE(outcome.traces.empty());
    EXPECT_TRUE(logLines().empty());
    clearLog();
  }
};

// ---- Exported factory functions --------------------------------------------------------------

TEST_F(FrameTest, EveryInstanceFactoryGivesItsMIWithItsName) {
  for (const Exported& exported : kInstanceMIs) {
    SCOPED_TRACE(exported.provider);
    Request request(broker_);
    const cmpihost::InstanceMILoad load =
        cmpihost::createInstanceMI(providerLibrary(), exported.provider, broker_, request);
    ASSERT_TRUE(load.ok()) << load.error;
    EXPECT_EQ(load.symbolName, exported.provider + "_Create_InstanceMI");
    EXPECT_EQ(load.miName, exported.miName);
    EXPECT_EQ(load.ftVersion, 200);
    EXPECT_EQ(load.miVersion, 200);
    EXPECT_EQ(load.status, StatusValue(CMPI_RC_OK));
    EXPECT_EQ(load.mi->hdl, nullptr);
    const CMPIInstanceMIFT* ft = load.mi->ft;
    EXPECT_NE(ft->cleanup, nullptr);
    EXPECT_NE(ft->enumerateInstanceNames, nullptr);
    EXPECT_NE(ft->enumerateInstances, nullptr);
    EXPECT_NE(ft->getInstance, nullptr);
    EXPECT_NE(ft->createInstance, nullptr);
    EXPECT_NE(ft->modifyInstance, nullptr);
    EXPECT_NE(ft->deleteInstance, nullptr);
    EXPECT_NE(ft->execQuery, nullptr);
  }
}

TEST_F(FrameTest, EveryAssociationFactoryGivesItsMIWithItsName) {
  for (const Exported& exported : kAssociationMIs) {
    SCOPED_TRACE(exported.provider);
    Request request(broker_);
    const cmpihost::AssociationMILoad load =
        cmpihost::createAssociationMI(providerLibrary(), exported.provider, broker_, request);
    ASSERT_TRUE(load.ok()) << load.error;
    EXPECT_EQ(load.symbolName, exported.provider + "_Create_AssociationMI");
    EXPECT_EQ(load.miName, exported.miName);
    EXPECT_EQ(load.ftVersion, 200);
    EXPECT_EQ(load.miVersion, 200);
    EXPECT_EQ(load.mi->hdl, nullptr);
    const CMPIAssociationMIFT* ft = load.mi->ft;
    EXPECT_NE(ft->cleanup, nullptr);
    EXPECT_NE(ft->associators, nullptr);
    EXPECT_NE(ft->associatorNames, nullptr);
    EXPECT_NE(ft->references, nullptr);
    EXPECT_NE(ft->referenceNames, nullptr);
  }
}

TEST_F(FrameTest, TheLightAndCapabilitiesProvidersHaveNoAssociationFactory) {
  EXPECT_FALSE(providerLibrary().hasSymbol(cmpihost::associationMISymbol(kLightProvider)));
  EXPECT_FALSE(providerLibrary().hasSymbol(cmpihost::associationMISymbol(kCapabilitiesProvider)));
}

TEST_F(FrameTest, FactoriesLeaveRcAndContextAloneAndCreateNothing) {
  broker_.resetCreationCounts();
  const std::size_t liveBefore = broker_.liveObjectCount();
  for (const Exported& exported : kInstanceMIs) {
    SCOPED_TRACE(exported.provider);
    InstanceFactory factory = instanceFactory(exported.provider);
    ASSERT_NE(factory, nullptr);
    CMPIStatus rc = sentinelStatus();
    CMPIInstanceMI* mi = factory(broker_.cmpi(), nullptr, &rc);
    ASSERT_NE(mi, nullptr);
    EXPECT_EQ(rc.rc, CMPI_RC_ERR_METHOD_NOT_AVAILABLE);
    EXPECT_EQ(rc.msg, sentinelStatus().msg);
    // A null rc is accepted too.
    EXPECT_EQ(factory(broker_.cmpi(), nullptr, nullptr), mi);
  }
  for (const Exported& exported : kAssociationMIs) {
    SCOPED_TRACE(exported.provider);
    AssociationFactory factory = associationFactory(exported.provider);
    ASSERT_NE(factory, nullptr);
    CMPIStatus rc = sentinelStatus();
    CMPIAssociationMI* mi = factory(broker_.cmpi(), nullptr, &rc);
    ASSERT_NE(mi, nullptr);
    EXPECT_EQ(rc.rc, CMPI_RC_ERR_METHOD_NOT_AVAILABLE);
    EXPECT_EQ(rc.msg, sentinelStatus().msg);
    EXPECT_EQ(factory(broker_.cmpi(), nullptr, nullptr), mi);
  }
  EXPECT_EQ(broker_.creationCounts().total(), 0u);
  EXPECT_EQ(broker_.liveObjectCount(), liveBefore);
  EXPECT_TRUE(broker_.calls().empty());
  EXPECT_TRUE(broker_.traces().empty());
  EXPECT_TRUE(logLines().empty());
}

TEST_F(FrameTest, CreatingAnMITwiceGivesTheSameMIAndKeepsTheSecondBroker) {
  useTree({blueLight("1.1")});
  cmpihost::Broker first;
  for (const Exported& exported : kInstanceMIs) {
    SCOPED_TRACE(exported.provider);
    InstanceFactory factory = instanceFactory(exported.provider);
    CMPIInstanceMI* once = factory(first.cmpi(), nullptr, nullptr);
    CMPIInstanceMI* twice = factory(broker_.cmpi(), nullptr, nullptr);
    EXPECT_EQ(once, twice);

    // The operation makes its objects through the broker of the second call.
    first.resetCreationCounts();
    broker_.resetCreationCounts();
    const Outcome outcome =
        cmpihost::enumerateInstanceNames(broker_, twice, classPath(exported.className));
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_GT(broker_.creationCounts()[cmpihost::CreatingFunction::NewObjectPath], 0u);
    EXPECT_EQ(first.creationCounts().total(), 0u);
    EXPECT_TRUE(first.calls().empty());
  }
  for (const Exported& exported : kAssociationMIs) {
    SCOPED_TRACE(exported.provider);
    AssociationFactory factory = associationFactory(exported.provider);
    EXPECT_EQ(factory(first.cmpi(), nullptr, nullptr), factory(broker_.cmpi(), nullptr, nullptr));
  }
}

TEST_F(FrameTest, InstanceAndAssociationFactoryOfOneSourceShareTheirBroker) {
  useTree({blueLight("1.1")});
  cmpihost::Broker other;
  for (const std::string& provider : {kElementCapabilitiesProvider, kSystemDeviceProvider}) {
    SCOPED_TRACE(provider);
    CMPIInstanceMI* mi = instanceFactory(provider)(other.cmpi(), nullptr, nullptr);
    // Creating the association MI afterwards replaces the broker of the instance MI as well.
    associationFactory(provider)(broker_.cmpi(), nullptr, nullptr);
    other.resetCreationCounts();
    broker_.resetCreationCounts();
    const std::string className = provider == kSystemDeviceProvider
                                      ? "KESTA_BlueLightSystemDevice"
                                      : "KESTA_BlueLightElementCapabilities";
    const Outcome outcome = cmpihost::enumerateInstanceNames(broker_, mi, classPath(className));
    EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
    EXPECT_GT(broker_.creationCounts().total(), 0u);
    EXPECT_EQ(other.creationCounts().total(), 0u);
  }
}

// ---- Operations that do nothing ----------------------------------------------------------------

TEST_F(FrameTest, CleanupOfEveryInstanceMIReturnsOkAndDoesNothing) {
  for (const Exported& exported : kInstanceMIs) {
    CMPIInstanceMI* mi = instanceMI(exported.provider);
    clearLog();
    expectNothingDone(cmpihost::cleanup(broker_, mi, true), StatusValue(CMPI_RC_OK),
                      exported.provider + " terminating");
    expectNothingDone(cmpihost::cleanup(broker_, mi, false), StatusValue(CMPI_RC_OK),
                      exported.provider + " not terminating");
  }
}

TEST_F(FrameTest, CleanupOfEveryAssociationMIReturnsOkAndDoesNothing) {
  for (const Exported& exported : kAssociationMIs) {
    CMPIAssociationMI* mi = associationMI(exported.provider);
    clearLog();
    expectNothingDone(cmpihost::cleanup(broker_, mi, true), StatusValue(CMPI_RC_OK),
                      exported.provider + " terminating");
    expectNothingDone(cmpihost::cleanup(broker_, mi, false), StatusValue(CMPI_RC_OK),
                      exported.provider + " not terminating");
  }
}

TEST_F(FrameTest, CreateModifyDeleteAndQueryAreNotSupportedByAnyClass) {
  useTree({blueLight("1.1")});
  for (const Exported& exported : kInstanceMIs) {
    CMPIInstanceMI* mi = instanceMI(exported.provider);
    clearLog();
    const ObjectPathValue path = exported.className == "KESTA_BlueLight"
                                     ? lightPath("Blue Light:1.1")
                                     : classPath(exported.className);
    const StatusValue notSupported(CMPI_RC_ERR_NOT_SUPPORTED);

    expectNothingDone(cmpihost::run(broker_,
                                    [&](Request& request) {
                                      CMPIObjectPath* cop = request.objectPath(path);
                                      CMPIInstance* instance =
                                          request.instance(InstanceValue(path));
                                      return mi->ft->createInstance(
                                          mi, request.context(), request.result(), cop, instance);
                                    }),
                      notSupported, exported.provider + " CreateInstance");
    expectNothingDone(cmpihost::run(broker_,
                                    [&](Request& request) {
                                      CMPIObjectPath* cop = request.objectPath(path);
                                      CMPIInstance* instance =
                                          request.instance(InstanceValue(path));
                                      return mi->ft->modifyInstance(
                                          mi, request.context(), request.result(), cop, instance,
                                          request.propertyList(Texts{"ElementName"}));
                                    }),
                      notSupported, exported.provider + " ModifyInstance");
    expectNothingDone(cmpihost::run(broker_,
                                    [&](Request& request) {
                                      return mi->ft->deleteInstance(mi, request.context(),
                                                                    request.result(),
                                                                    request.objectPath(path));
                                    }),
                      notSupported, exported.provider + " DeleteInstance");
    expectNothingDone(cmpihost::run(broker_,
                                    [&](Request& request) {
                                      return mi->ft->execQuery(
                                          mi, request.context(), request.result(),
                                          request.classPath(exported.className),
                                          ("SELECT * FROM " + exported.className).c_str(), "WQL");
                                    }),
                      notSupported, exported.provider + " ExecQuery");
  }
}

// ---- The operation frame ---------------------------------------------------------------------

TEST_F(FrameTest, ParameterListShowsTheArgumentsAsTheyCame) {
  // Without lights the operation ends before it would touch the context, the result or the path,
  // so made-up addresses are safe here.
  CMPIInstanceMI* mi = instanceMI(kLightProvider);
  const Outcome outcome = cmpihost::run(broker_, [&](Request&) {
    return mi->ft->enumerateInstanceNames(
        reinterpret_cast<CMPIInstanceMI*>(0x10), reinterpret_cast<const CMPIContext*>(0x20),
        reinterpret_cast<const CMPIResult*>(0x30), reinterpret_cast<const CMPIObjectPath*>(0x40));
  });
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));

  Texts provider;
  Texts factory;
  for (const testsupport::LogLine& line : logLines()) {
    if (line.kind != "LOG") continue;
    if (line.category == "Varnel.BlueLightProvider") {
      provider.push_back(testsupport::maskLineNumbers(line.text));
    }
    if (line.category == "Varnel.BlueLightObjFactory") {
      factory.push_back(testsupport::maskLineNumbers(line.text));
    }
  }
  EXPECT_EQ(provider,
            (Texts{"ENTERING: BlueLight_EnumInstanceNames() in BlueLightProvider.cpp [Line: N],"
                   "Parameters List:  mi=0x10 ctx=0x20 result=0x30 ref=0x40"}));
  ASSERT_EQ(factory.size(), 1u);
  EXPECT_NE(factory[0].find(" ref=0x40 objectPaths=0x"), std::string::npos) << factory[0];
}

TEST_F(FrameTest, NullArgumentsAreWrittenAsZero) {
  CMPIInstanceMI* mi = instanceMI(kLightProvider);
  cmpihost::run(broker_, [&](Request&) {
    return mi->ft->enumerateInstanceNames(nullptr, nullptr, nullptr, nullptr);
  });
  EXPECT_EQ(log("Varnel.BlueLightProvider"),
            (Texts{entering("BlueLight_EnumInstanceNames", "BlueLightProvider.cpp",
                            " mi=0 ctx=0 result=0 ref=0")}));
}

TEST_F(FrameTest, EveryLineGoesToTheLogLevelAndThenToTheTraceLevelAt3000) {
  useTree({blueLight("1.1")});
  cmpihost::enumerateInstances(broker_, instanceMI(kLightProvider), classPath("KESTA_BlueLight"));

  const std::vector<testsupport::LogLine> lines = logLines();
  ASSERT_EQ(lines.size() % 2, 0u);
  Texts sequence;
  for (std::size_t index = 0; index < lines.size(); index += 2) {
    const testsupport::LogLine& logged = lines[index];
    const testsupport::LogLine& traced = lines[index + 1];
    EXPECT_EQ(logged.kind, "LOG");
    EXPECT_EQ(traced.kind, "TRACE");
    EXPECT_EQ(traced.text, logged.text);
    EXPECT_EQ(traced.category, logged.category);
    EXPECT_EQ(logged.level, 3000);
    EXPECT_EQ(traced.level, 3000);
    const std::string text = logged.text;
    sequence.push_back(logged.category + " " + text.substr(0, text.find(" in ")));
  }
  // Entry line, collection, the factory call, and the exit line last.
  EXPECT_EQ(sequence, (Texts{"Varnel.BlueLightProvider ENTERING: BlueLight_EnumInstances()",
                             "Varnel.BlueLight ENTERING: setVector()",
                             "Varnel.BlueLight EXITING: setVector()",
                             "Varnel.BlueLightObjFactory ENTERING: getAllBlueLightCMPIInstances()",
                             "Varnel.BlueLightObjFactory ENTERING: makeBlueLightInstance()",
                             "Varnel.BlueLightObjFactory EXITING: makeBlueLightInstance()",
                             "Varnel.BlueLightObjFactory EXITING: getAllBlueLightCMPIInstances()",
                             "Varnel.BlueLightProvider EXITING: BlueLight_EnumInstances()"}));
}

TEST_F(FrameTest, ANonZeroFactoryResultEndsWithTheStatusAsItStandsWithoutDoneOrExitLine) {
  // No light: the path enumeration reports that there is nothing and leaves the status alone.
  const Outcome outcome = cmpihost::enumerateInstanceNames(broker_, instanceMI(kLightProvider),
                                                           classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.status.message, std::nullopt);
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(log("Varnel.BlueLightProvider"),
            (Texts{entering("BlueLight_EnumInstanceNames", "BlueLightProvider.cpp",
                            " mi=PTR ctx=PTR result=PTR ref=PTR")}));
}

TEST_F(FrameTest, AFactoryFailureEndsWithTheFactorysStatusWithoutDoneOrExitLine) {
  useTree({blueLight("1.1")});
  CMPIInstanceMI* mi = instanceMI(kCapabilitiesProvider);
  broker_.armFault(cmpihost::Fault::nullResult(cmpihost::CreatingFunction::NewObjectPath, 1));
  const Outcome outcome =
      cmpihost::enumerateInstanceNames(broker_, mi, classPath("KESTA_BlueLightCapabilities"));

  EXPECT_EQ(outcome.status,
            StatusValue(CMPI_RC_ERR_FAILED, std::string("Create CMPIObjectPath failed")));
  EXPECT_EQ(outcome.doneCount, 0u);
  EXPECT_TRUE(outcome.results.empty());
  EXPECT_EQ(
      log("Varnel.BlueLightCapabilitiesProvider"),
      (Texts{entering("BlueLightCapabilities_EnumInstanceNames",
                      "BlueLightCapabilitiesProvider.cpp", " mi=PTR ctx=PTR result=PTR ref=PTR")}));
}

TEST_F(FrameTest, AnEmptySuccessfulResultGivesOneDoneAndBothLines) {
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMI(kLightProvider),
                                                       classPath("KESTA_BlueLight"));

  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.status.message, std::nullopt);
  EXPECT_EQ(handOverKinds(outcome), (Texts{"Done Valid"}));
  const std::string list = " mi=PTR ctx=PTR result=PTR ref=PTR properties=0";
  EXPECT_EQ(log("Varnel.BlueLightProvider"),
            (Texts{entering("BlueLight_EnumInstances", "BlueLightProvider.cpp", list),
                   exiting("BlueLight_EnumInstances", "BlueLightProvider.cpp", list)}));
}

TEST_F(FrameTest, HandOverComesInFactoryOrderAndDoneComesLast) {
  useTree({blueLight("1.3"), blueLight("1.1"), blueLight("1.2")});
  const Outcome outcome = cmpihost::enumerateInstances(broker_, instanceMI(kLightProvider),
                                                       classPath("KESTA_BlueLight"));
  EXPECT_EQ(handOverKinds(outcome),
            (Texts{"Instance Valid", "Instance Valid", "Instance Valid", "Done Valid"}));
  Texts ids;
  for (const InstanceValue& instance : outcome.instances()) {
    ids.push_back(instance.find("DeviceID")->asString());
  }
  EXPECT_EQ(ids, (Texts{"Blue Light:1.1", "Blue Light:1.2", "Blue Light:1.3"}));
  EXPECT_EQ(outcome.doneCount, 1u);
}

TEST_F(FrameTest, NothingIsKeptBetweenOperations) {
  CMPIInstanceMI* mi = instanceMI(kLightProvider);
  useTree({blueLight("1.1"), blueLight("1.2")});
  EXPECT_EQ(
      cmpihost::enumerateInstances(broker_, mi, classPath("KESTA_BlueLight")).instances().size(),
      2u);
  useTree({});
  const Outcome outcome = cmpihost::enumerateInstances(broker_, mi, classPath("KESTA_BlueLight"));
  EXPECT_TRUE(outcome.instances().empty());
  EXPECT_EQ(outcome.doneCount, 1u);
}

}  // namespace
}  // namespace blackbox
