// Several requests at once from several threads, on one broker, against the test provider.
#include <atomic>
#include <thread>

#include <cmpihost/driver.h>

#include "host_test_support.h"

namespace cmpihost {
namespace {

constexpr int kThreads = 8;
constexpr int kRequestsPerThread = 200;

class ConcurrencyTest : public ::testing::Test {
 protected:
  void SetUp() override {
    instanceMI = createInstanceMI(library, "HostTestProvider", broker, nullptr).mi;
    associationMI = createAssociationMI(library, "HostTestProvider", broker, nullptr).mi;
    ASSERT_NE(instanceMI, nullptr);
    ASSERT_NE(associationMI, nullptr);
    InstanceValue system;
    system.set("CreationClassName", "KESTA_ComputerSystem").set("Name", "host1");
    broker.setUpcallInstances("KESTA_ComputerSystem", {system});
  }

  // Runs `work(thread, iteration)` on kThreads threads at once; counts the mismatches it reports.
  int runEverywhere(const std::function<bool(int, int)>& work) {
    std::atomic<int> mismatches{0};
    std::atomic<bool> go{false};
    std::vector<std::thread> threads;
    threads.reserve(kThreads);
    for (int t = 0; t < kThreads; ++t) {
      threads.emplace_back([&, t] {
        while (!go.load()) std::this_thread::yield();
        for (int i = 0; i < kRequestsPerThread; ++i) {
          if (!work(t, i)) mismatches.fetch_add(1);
        }
      });
    }
    go.store(true);
    for (std::thread& thread : threads) thread.join();
    return mismatches.load();
  }

  static ObjectPathValue light() {
    return ObjectPathValue("root/cimv2", "KESTA_BlueLight")
        .addKey("CreationClassName", "KESTA_BlueLight")
        .addKey("DeviceID", "Blue Light:1");
  }

  Broker broker;
  ProviderLibrary library{HOST_TEST_PROVIDER_PATH};
  CMPIInstanceMI* instanceMI = nullptr;
  CMPIAssociationMI* associationMI = nullptr;
};

TEST_F(ConcurrencyTest, DriverOperationsGiveTheSameResultsOnEveryThread) {
  const ObjectPathValue lightClass("root/cimv2", "KESTA_BlueLight");
  const Outcome expectedInstances = enumerateInstances(broker, instanceMI, lightClass);
  const Outcome expectedReferences = references(broker, associationMI, light());
  broker.clearRecords();

  const int mismatches = runEverywhere([&](int thread, int iteration) {
    if ((thread + iteration) % 2 == 0) {
      const Outcome outcome = enumerateInstances(broker, instanceMI, lightClass);
      return outcome.status.ok() && outcome.instances() == expectedInstances.instances() &&
             outcome.calls.size() == expectedInstances.calls.size() && outcome.doneCount == 1;
    }
    const Outcome outcome = references(broker, associationMI, light());
    return outcome.status.ok() && outcome.instances() == expectedReferences.instances() &&
           outcome.traces.size() == expectedReferences.traces.size();
  });
  EXPECT_EQ(mismatches, 0);
  EXPECT_EQ(broker.liveObjectCount(), 0u);
  // Every hand-over was recorded broker-wide too: 2 instances + done, or 1 reference + done.
  const std::size_t half = kThreads * kRequestsPerThread / 2;
  EXPECT_EQ(broker.results().size(), half * 3 + half * 2);
}

TEST_F(ConcurrencyTest, ObjectsOfEachRequestStayItsOwn) {
  const int mismatches = runEverywhere([&](int thread, int iteration) {
    Request request(broker);
    const std::string id = std::to_string(thread) + ":" + std::to_string(iteration);
    CMPIObjectPath* path = CMNewObjectPath(broker.cmpi(), "ns", "C", nullptr);
    CMAddKey(path, "Id", id.c_str(), CMPI_chars);
    CMPIInstance* instance = CMNewInstance(broker.cmpi(), path, nullptr);
    CMSetProperty(instance, "Id", id.c_str(), CMPI_chars);
    CMReturnInstance(request.result(), instance);
    if (iteration % 3 == 0) CMRelease(path);
    const std::vector<ResultEvent> results = request.results();
    return request.liveObjectCount() == (iteration % 3 == 0 ? 3u : 4u) && results.size() == 1 &&
           results[0].instance()->find("Id")->asString() == id;
  });
  EXPECT_EQ(mismatches, 0);
  EXPECT_EQ(broker.liveObjectCount(), 0u);
}

TEST_F(ConcurrencyTest, ConfigurationFaultsAndRecordingWhileRequestsRun) {
  std::atomic<bool> stop{false};
  std::thread configurer([&] {
    int round = 0;
    while (!stop.load()) {
      broker.setClassKeys("C" + std::to_string(round % 5), {"Id"});
      broker.setRecording(round % 2 == 0);
      const FaultId id = broker.armFault(Fault::nullResult(CreatingFunction::NewArgs, 1));
      broker.disarmFault(id);
      broker.calls();
      broker.creationCounts();
      if (round % 50 == 0) broker.clearRecords();
      ++round;
    }
  });
  const ObjectPathValue lightClass("root/cimv2", "KESTA_BlueLight");
  const int mismatches = runEverywhere([&](int, int) {
    const Outcome outcome = enumerateInstanceNames(broker, instanceMI, lightClass);
    return outcome.status.ok() && outcome.paths().size() == 2;
  });
  stop.store(true);
  configurer.join();
  EXPECT_EQ(mismatches, 0);
  EXPECT_EQ(broker.liveObjectCount(), 0u);
}

TEST_F(ConcurrencyTest, BrokerOwnedObjectsFromManyThreads) {
  const int mismatches = runEverywhere(
      [&](int, int) { return CMNewString(broker.cmpi(), "shared", nullptr) != nullptr; });
  EXPECT_EQ(mismatches, 0);
  EXPECT_EQ(broker.brokerOwnedObjectCount(),
            static_cast<std::size_t>(kThreads * kRequestsPerThread));
}

}  // namespace
}  // namespace cmpihost
