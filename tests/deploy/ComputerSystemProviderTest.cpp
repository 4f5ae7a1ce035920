// The computer-system provider, loaded from its built library through the in-process host the way
// an object manager loads it: one KESTA_ComputerSystem instance naming this host, its property
// filter, GetInstance of this and of other names, the refused operations, and a broker that
// cannot create objects.
#include <gtest/gtest.h>

#include <optional>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include "DeployFiles.h"
#include "KestaCommon.h"
#include "TestSupport.h"
#include "cmpihost/cmpihost.h"

namespace {

using cmpihost::InstanceValue;
using cmpihost::ObjectPathValue;
using cmpihost::Outcome;
using cmpihost::PropertyList;
using cmpihost::StatusValue;
using cmpihost::Value;

const char* const kProvider = "KestaComputerSystemProvider";
const char* const kClass = "KESTA_ComputerSystem";
const char* const kNameSpace = "root/cimv2";
const std::string kSystemName = "server7.kesta.example";

std::set<std::string> propertyNames(const InstanceValue& instance) {
  std::set<std::string> names;
  for (const cmpihost::Property& property : instance.properties()) names.insert(property.name);
  return names;
}

class ComputerSystemProviderTest : public ::testing::Test {
 public:
  ComputerSystemProviderTest(const ComputerSystemProviderTest&) = delete;
  ComputerSystemProviderTest& operator=(const ComputerSystemProviderTest&) = delete;
  ~ComputerSystemProviderTest() override {
    if (load_.ok()) cmpihost::cleanup(broker_, load_.mi);
  }

 protected:
  ComputerSystemProviderTest()
      : systemName_("KESTA_SYSTEM_NAME", kSystemName),
        library_(deploy::libraryPathFor("kestacomputersystemprovider")) {
    cmpihost::Request request(broker_);
    load_ = cmpihost::createInstanceMI(library_, kProvider, broker_, request);
  }

  void SetUp() override { ASSERT_TRUE(load_.ok()) << load_.error; }

  CMPIInstanceMI* mi() const { return load_.mi; }

  static ObjectPathValue classPath(const std::string& nameSpace = kNameSpace) {
    return ObjectPathValue(nameSpace, kClass);
  }

  static ObjectPathValue systemPath(const std::string& name,
                                    const std::string& creationClass = kClass) {
    ObjectPathValue path(kNameSpace, kClass);
    path.addKey("CreationClassName", creationClass).addKey("Name", name);
    return path;
  }

  Outcome enumerate(const PropertyList& properties = std::nullopt) {
    return cmpihost::enumerateInstances(broker_, mi(), classPath(), properties);
  }

  Outcome get(const ObjectPathValue& path, const PropertyList& properties = std::nullopt) {
    return cmpihost::getInstance(broker_, mi(), path, properties);
  }

  testsupport::ScopedEnv systemName_;
  cmpihost::Broker broker_;
  cmpihost::ProviderLibrary library_;
  cmpihost::InstanceMILoad load_;
};

TEST_F(ComputerSystemProviderTest, FactoryReturnsACmpi2InstanceMi) {
  EXPECT_EQ(load_.symbolName, "KestaComputerSystemProvider_Create_InstanceMI");
  EXPECT_EQ(load_.miName, "instanceKestaComputerSystemProvider");
  EXPECT_EQ(load_.ftVersion, 200);
  EXPECT_EQ(load_.miVersion, 200);
  EXPECT_EQ(load_.status.rc, CMPI_RC_OK);
}

TEST_F(ComputerSystemProviderTest, TheLibraryHasNoAssociationMi) {
  EXPECT_FALSE(library_.hasSymbol("KestaComputerSystemProvider_Create_AssociationMI"));
  // The platform code linked into the library stays inside it.
  EXPECT_FALSE(library_.hasSymbol("_ZN5Kesta13getSystemNameB5cxx11Ev"));
}

TEST_F(ComputerSystemProviderTest, EnumInstanceNamesGivesThisSystem) {
  const Outcome outcome = cmpihost::enumerateInstanceNames(broker_, mi(), classPath());
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.doneCount, 1u);
  const std::vector<ObjectPathValue> paths = outcome.paths();
  ASSERT_EQ(paths.size(), 1u);
  const ObjectPathValue& path = paths.front();
  EXPECT_EQ(path.className(), kClass);
  EXPECT_EQ(path.nameSpace(), kNameSpace);
  EXPECT_EQ(path.host(), kSystemName);
  ASSERT_EQ(path.keys().size(), 2u);
  EXPECT_EQ(*path.findKey("CreationClassName"), Value(kClass));
  EXPECT_EQ(*path.findKey("Name"), Value(kSystemName));
}

TEST_F(ComputerSystemProviderTest, PathsAreInTheNamespaceOfTheRequest) {
  const Outcome names = cmpihost::enumerateInstanceNames(broker_, mi(), classPath("root/kesta"));
  ASSERT_EQ(names.paths().size(), 1u);
  EXPECT_EQ(names.paths().front().nameSpace(), "root/kesta");
  const Outcome instances = cmpihost::enumerateInstances(broker_, mi(), classPath("root/kesta"));
  ASSERT_EQ(instances.instances().size(), 1u);
  EXPECT_EQ(instances.instances().front().path().nameSpace(), "root/kesta");
}

TEST_F(ComputerSystemProviderTest, EnumInstancesGivesEveryProperty) {
  const Outcome outcome = enumerate();
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.doneCount, 1u);
  const std::vector<InstanceValue> instances = outcome.instances();
  ASSERT_EQ(instances.size(), 1u);
  const InstanceValue& system = instances.front();
  EXPECT_EQ(propertyNames(system),
            (std::set<std::string>{"CreationClassName", "Name", "ElementName", "NameFormat",
                                   "Dedicated", "EnabledState", "RequestedState"}));
  EXPECT_EQ(*system.find("CreationClassName"), Value(kClass));
  EXPECT_EQ(*system.find("Name"), Value(kSystemName));
  EXPECT_EQ(*system.find("ElementName"), Value(kSystemName));
  EXPECT_EQ(*system.find("NameFormat"), Value("IP"));
  EXPECT_EQ(*system.find("Dedicated"), Value::array(CMPI_uint16, {Value::uint16(0)}));
  EXPECT_EQ(*system.find("EnabledState"), Value::uint16(2));
  EXPECT_EQ(*system.find("RequestedState"), Value::uint16(12));
  // The instance's path is the one EnumInstanceNames gives.
  const Outcome names = cmpihost::enumerateInstanceNames(broker_, mi(), classPath());
  ASSERT_EQ(names.paths().size(), 1u);
  EXPECT_TRUE(system.path().equivalent(names.paths().front())) << system.path();
}

TEST_F(ComputerSystemProviderTest, PropertyListKeepsTheKeysAndTheListedProperties) {
  const Outcome outcome = enumerate(std::vector<std::string>{"ElementName", "Dedicated"});
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyNames(outcome.instances().front()),
            (std::set<std::string>{"CreationClassName", "Name", "ElementName", "Dedicated"}));
}

TEST_F(ComputerSystemProviderTest, EmptyPropertyListKeepsOnlyTheKeys) {
  const Outcome outcome = enumerate(std::vector<std::string>{});
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyNames(outcome.instances().front()),
            (std::set<std::string>{"CreationClassName", "Name"}));
}

TEST_F(ComputerSystemProviderTest, PropertyListIgnoresCaseAndUnknownNames) {
  const Outcome outcome =
      enumerate(std::vector<std::string>{"namefORMAT", "NoSuchProperty", "enabledstate"});
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyNames(outcome.instances().front()),
            (std::set<std::string>{"CreationClassName", "Name", "NameFormat", "EnabledState"}));
}

TEST_F(ComputerSystemProviderTest, GetInstanceOfThisSystem) {
  const Outcome outcome = get(systemPath(kSystemName));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(outcome.doneCount, 1u);
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(outcome.instances().front(), enumerate().instances().front());
}

TEST_F(ComputerSystemProviderTest, GetInstanceAppliesThePropertyList) {
  const Outcome outcome = get(systemPath(kSystemName), std::vector<std::string>{"RequestedState"});
  ASSERT_EQ(outcome.instances().size(), 1u);
  EXPECT_EQ(propertyNames(outcome.instances().front()),
            (std::set<std::string>{"CreationClassName", "Name", "RequestedState"}));
}

TEST_F(ComputerSystemProviderTest, GetInstanceComparesNamesIgnoringCase) {
  const Outcome outcome = get(systemPath("SERVER7.Kesta.Example", "kesta_computersystem"));
  EXPECT_EQ(outcome.status, StatusValue(CMPI_RC_OK));
  ASSERT_EQ(outcome.instances().size(), 1u);
  // The instance carries the system's own spelling, not the client's.
  EXPECT_EQ(*outcome.instances().front().find("Name"), Value(kSystemName));
}

TEST_F(ComputerSystemProviderTest, GetInstanceOfAnotherSystemIsNotFound) {
  const Outcome outcome = get(systemPath("server8.kesta.example"));
  EXPECT_EQ(outcome.status.rc, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_TRUE(outcome.status.message.has_value());
  EXPECT_TRUE(outcome.instances().empty());
}

TEST_F(ComputerSystemProviderTest, GetInstanceOfAnotherClassIsNotFound) {
  EXPECT_EQ(get(systemPath(kSystemName, "CIM_ComputerSystem")).status.rc, CMPI_RC_ERR_NOT_FOUND);
}

TEST_F(ComputerSystemProviderTest, GetInstanceWithIncompleteOrWrongKeysIsNotFound) {
  ObjectPathValue noName(kNameSpace, kClass);
  noName.addKey("CreationClassName", kClass);
  ObjectPathValue noClass(kNameSpace, kClass);
  noClass.addKey("Name", kSystemName);
  ObjectPathValue numericName(kNameSpace, kClass);
  numericName.addKey("CreationClassName", kClass).addKey("Name", Value::uint16(7));
  for (const ObjectPathValue& path : {classPath(), noName, noClass, numericName}) {
    const Outcome outcome = get(path);
    EXPECT_EQ(outcome.status.rc, CMPI_RC_ERR_NOT_FOUND) << path;
    EXPECT_TRUE(outcome.instances().empty()) << path;
  }
}

TEST_F(ComputerSystemProviderTest, TheNameFollowsTheSystemNameOfEveryOperation) {
  {
    testsupport::ScopedEnv renamed("KESTA_SYSTEM_NAME", std::string("renamed.example"));
    const Outcome outcome = enumerate();
    ASSERT_EQ(outcome.instances().size(), 1u);
    EXPECT_EQ(*outcome.instances().front().find("Name"), Value("renamed.example"));
    EXPECT_EQ(get(systemPath(kSystemName)).status.rc, CMPI_RC_ERR_NOT_FOUND);
  }
  EXPECT_EQ(*enumerate().instances().front().find("Name"), Value(kSystemName));
}

TEST_F(ComputerSystemProviderTest, WithoutAConfiguredNameItIsTheNameThePlatformGives) {
  testsupport::ScopedEnv unset("KESTA_SYSTEM_NAME", std::nullopt);
  const Outcome outcome = enumerate();
  ASSERT_EQ(outcome.instances().size(), 1u);
  // The same rules as for the lights' SystemName, so the two always agree.
  EXPECT_EQ(*outcome.instances().front().find("Name"), Value(Kesta::getSystemName()));
}

TEST_F(ComputerSystemProviderTest, ChangingOperationsAreNotSupported) {
  const auto expectNotSupported = [&](const char* what, auto&& call) {
    const Outcome outcome = cmpihost::run(broker_, [&](cmpihost::Request& request) {
      return call(request, request.objectPath(systemPath(kSystemName)));
    });
    EXPECT_EQ(outcome.status.rc, CMPI_RC_ERR_NOT_SUPPORTED) << what;
    EXPECT_TRUE(outcome.results.empty()) << what;
  };
  InstanceValue instance(systemPath(kSystemName));
  instance.set("CreationClassName", kClass).set("Name", kSystemName);
  expectNotSupported("CreateInstance", [&](cmpihost::Request& r, CMPIObjectPath* path) {
    return mi()->ft->createInstance(mi(), r.context(), r.result(), path, r.instance(instance));
  });
  expectNotSupported("ModifyInstance", [&](cmpihost::Request& r, CMPIObjectPath* path) {
    return mi()->ft->modifyInstance(mi(), r.context(), r.result(), path, r.instance(instance),
                                    nullptr);
  });
  expectNotSupported("DeleteInstance", [&](cmpihost::Request& r, CMPIObjectPath* path) {
    return mi()->ft->deleteInstance(mi(), r.context(), r.result(), path);
  });
  expectNotSupported("ExecQuery", [&](cmpihost::Request& r, CMPIObjectPath* path) {
    return mi()->ft->execQuery(mi(), r.context(), r.result(), path,
                               "SELECT * FROM KESTA_ComputerSystem", "WQL");
  });
}

TEST_F(ComputerSystemProviderTest, CleanupSucceedsAndTheMiKeepsWorking) {
  EXPECT_EQ(cmpihost::cleanup(broker_, mi(), false).status, StatusValue(CMPI_RC_OK));
  EXPECT_EQ(enumerate().instances().size(), 1u);
}

// Every object the provider asks the broker for, failing in every way the host can make it
// fail: the operation fails cleanly, hands out no instance and does not crash.
TEST_F(ComputerSystemProviderTest, SurvivesABrokerThatCannotCreateObjects) {
  broker_.resetCreationCounts();
  ASSERT_EQ(enumerate().instances().size(), 1u);
  const cmpihost::CreationCounts counts = broker_.creationCounts();
  std::size_t tried = 0;
  for (cmpihost::CreatingFunction function :
       {cmpihost::CreatingFunction::NewObjectPath, cmpihost::CreatingFunction::NewInstance,
        cmpihost::CreatingFunction::NewArray}) {
    ASSERT_GT(counts[function], 0u) << function;
    for (std::uint64_t nth = 1; nth <= counts[function]; ++nth) {
      for (const cmpihost::Fault& fault :
           {cmpihost::Fault::nullResult(function, nth), cmpihost::Fault::nullHandle(function, nth),
            cmpihost::Fault::errorStatus(function, nth)}) {
        SCOPED_TRACE(::testing::Message() << function << " #" << nth << " " << fault.kind);
        const cmpihost::FaultId id = broker_.armFault(fault);
        const Outcome outcome = enumerate();
        broker_.disarmFault(id);
        EXPECT_EQ(outcome.status.rc, CMPI_RC_ERR_FAILED);
        EXPECT_TRUE(outcome.status.message.has_value());
        EXPECT_TRUE(outcome.instances().empty());
        ++tried;
      }
    }
  }
  EXPECT_GE(tried, 9u);
  // Names need a path only.
  const cmpihost::FaultId id =
      broker_.armFault(cmpihost::Fault::nullResult(cmpihost::CreatingFunction::NewObjectPath));
  const Outcome names = cmpihost::enumerateInstanceNames(broker_, mi(), classPath());
  broker_.disarmFault(id);
  EXPECT_EQ(names.status.rc, CMPI_RC_ERR_FAILED);
  EXPECT_TRUE(names.paths().empty());
}

// Object managers call one provider from several threads at once.
TEST_F(ComputerSystemProviderTest, ConcurrentOperationsAllSucceed) {
  broker_.setRecording(false);
  constexpr int kThreads = 4;
  constexpr int kRounds = 50;
  std::vector<int> failures(kThreads, 0);
  std::vector<std::thread> threads;
  threads.reserve(kThreads);
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      for (int round = 0; round < kRounds; ++round) {
        const Outcome outcome = t % 2 == 0 ? enumerate() : get(systemPath(kSystemName));
        if (!outcome.status.ok() || outcome.instances().size() != 1) ++failures[t];
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(failures, std::vector<int>(kThreads, 0));
}

}  // namespace
