// Concurrency gate: an object manager runs each request on a thread of its own, so every read
// operation of the provider must give, on eight threads at once, exactly what it gives alone.
// Built with -DBLUELIGHT_SANITIZERS=thread this is also the data-race gate of the provider and
// of the host.
#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <iostream>
#include <memory>
#include <mutex>
#include <thread>

#include "ReliabilityWorkload.h"

namespace reliability {
namespace {

constexpr int kThreads = 8;
// 8 x 2,600 = 20,800 operations: about 38 s of processor time under the thread sanitizer.
constexpr int kOperationsPerThread = 2600;
// The runs with the broker recording every call are shorter: rendering and keeping the records
// costs twice what the provider's own work costs.
constexpr int kRecordedOperationsPerThread = 200;
// The broker keeps a copy of every recorded call; one thread empties it now and then so that the
// run does not grow without bound.
constexpr int kClearRecordsEvery = 50;

cmpihost::BrokerOptions brokerOptions(bool recording) {
  cmpihost::BrokerOptions options;
  options.recording = recording;
  return options;
}

// Without recording, as an object manager runs: the outcomes hold the status, the hand-overs and
// the CMReturnDone calls.
class ConcurrencyTest : public ::testing::Test {
 protected:
  explicit ConcurrencyTest(bool recording = false)
      : brokerHolder_(std::make_unique<cmpihost::Broker>(brokerOptions(recording))),
        broker_(*brokerHolder_) {}

  void SetUp() override {
    World::configure(broker_);
    mis_ = createMIs(library_, broker_);
    operations_ = readOperations(broker_, mis_);
    for (const Operation& operation : operations_) {
      expected_.push_back(render(operation.run(broker_, mis_)));
    }
    broker_.clearRecords();
  }

  void TearDown() override { cleanupMIs(broker_, mis_); }

  // Runs `work(thread)` on kThreads threads released at once.
  static void onEveryThread(const std::function<void(int)>& work) {
    std::atomic<bool> go{false};
    std::vector<std::thread> threads;
    threads.reserve(kThreads);
    for (int t = 0; t < kThreads; ++t) {
      threads.emplace_back([&go, &work, t] {
        while (!go.load()) std::this_thread::yield();
        work(t);
      });
    }
    go.store(true);
    for (std::thread& thread : threads) thread.join();
  }

  // Runs the operations interleaved on every thread: thread t starts its walk through the list
  // at a different place and takes a different stride, so that at any moment the threads are
  // in different operations of different providers. Returns the number of operations run.
  int runInterleaved(int operationsPerThread, std::atomic<int>& mismatches) {
    std::atomic<int> count{0};
    const int size = static_cast<int>(operations_.size());
    onEveryThread([&](int t) {
      const int stride = (t % 2 == 0) ? 1 : size - 1;
      int index = (t * size) / kThreads;
      for (int i = 0; i < operationsPerThread; ++i) {
        const Operation& operation = operations_[index];
        const std::string actual = render(operation.run(broker_, mis_));
        if (actual != expected_[index]) noteMismatch(mismatches, operation, index, actual);
        if (t == 0 && i % kClearRecordsEvery == 0) broker_.clearRecords();
        index = (index + stride) % size;
        count.fetch_add(1, std::memory_order_relaxed);
      }
    });
    return count.load();
  }

  void noteMismatch(std::atomic<int>& mismatches, const Operation& operation, int index,
                    const std::string& actual) {
    if (mismatches.fetch_add(1) < 3) {
      std::lock_guard<std::mutex> lock(reportMutex_);
      ADD_FAILURE() << operation.name << " gave on a thread:\n"
                    << actual << "alone it gives:\n"
                    << expected_[index];
    }
  }

  World world_;
  cmpihost::ProviderLibrary library_{kLibraryPath};
  std::unique_ptr<cmpihost::Broker> brokerHolder_;
  cmpihost::Broker& broker_;
  ProviderMIs mis_;
  std::vector<Operation> operations_;
  std::vector<std::string> expected_;
  std::mutex reportMutex_;
};

// With every call, trace and result recorded by the broker as well: the outcomes also hold the
// broker traces of each operation, and the host's records are written from every thread.
class ConcurrencyRecordingTest : public ConcurrencyTest {
 protected:
  ConcurrencyRecordingTest() : ConcurrencyTest(true) {}
};

TEST_F(ConcurrencyTest, EveryReadOperationGivesOnEightThreadsWhatItGivesAlone) {
  // All but two operations of the list hand over objects to compare (the GetInstance of a
  // missing light gives nothing, the one without keys a failure), and one fails.
  ASSERT_GE(operations_.size(), 30u);
  std::size_t withObjects = 0;
  std::size_t failing = 0;
  for (const std::string& expected : expected_) {
    if (expected.find("\nInstance ") != std::string::npos ||
        expected.find("\nObjectPath ") != std::string::npos) {
      ++withObjects;
    }
    if (expected.rfind("status CMPI_RC_OK\n", 0) != 0) ++failing;
  }
  EXPECT_EQ(withObjects, operations_.size() - 2);
  EXPECT_EQ(failing, 1u);

  std::atomic<int> mismatches{0};
  const double start = now();
  const double startCpu = cpuSeconds();
  const int operations = runInterleaved(kOperationsPerThread, mismatches);
  const double seconds = now() - start;
  std::cout << "[ figures  ] " << operations << " operations of " << operations_.size()
            << " kinds on " << kThreads << " threads in " << seconds << " s ("
            << cpuSeconds() - startCpu << " s of processor time)" << std::endl;

  EXPECT_GE(operations, 20000);
  EXPECT_EQ(mismatches.load(), 0);
  // Every object the provider made belonged to its request and was freed with it.
  EXPECT_EQ(broker_.liveObjectCount(), 0u);
  EXPECT_EQ(broker_.brokerOwnedObjectCount(), 0u);
}

TEST_F(ConcurrencyRecordingTest, BrokerTracesOfEveryOperationAreItsOwnOnEveryThread) {
  // The broker traces are part of what is compared: four operations of the list send some.
  std::size_t withTraces = 0;
  for (const std::string& expected : expected_) {
    if (expected.find("\ntrace ") != std::string::npos) ++withTraces;
  }
  EXPECT_GE(withTraces, 4u);

  std::atomic<int> mismatches{0};
  const int operations = runInterleaved(kRecordedOperationsPerThread, mismatches);
  EXPECT_EQ(operations, kThreads * kRecordedOperationsPerThread);
  EXPECT_EQ(mismatches.load(), 0);
  EXPECT_EQ(broker_.liveObjectCount(), 0u);
}

// The object manager may create an MI again (after reloading its registration, or for a request
// of another class of the same library) while other requests are running; the factory functions
// store the broker that operations on other threads read.
TEST_F(ConcurrencyRecordingTest, FactoryFunctionsMayRunWhileOperationsRun) {
  std::atomic<bool> stop{false};
  std::atomic<int> creations{0};
  std::thread creator([&] {
    while (!stop.load()) {
      const ProviderMIs again = createMIs(library_, broker_);
      // The factory functions hand out the same MIs every time.
      if (again.light != mis_.light ||
          again.systemDeviceAssociation != mis_.systemDeviceAssociation) {
        ADD_FAILURE() << "a factory function gave another MI";
      }
      creations.fetch_add(1);
      std::this_thread::yield();
    }
  });

  std::atomic<int> mismatches{0};
  const int size = static_cast<int>(operations_.size());
  onEveryThread([&](int t) {
    for (int i = 0; i < kRecordedOperationsPerThread; ++i) {
      const int index = (t * 5 + i) % size;
      const std::string actual = render(operations_[index].run(broker_, mis_));
      if (actual != expected_[index]) noteMismatch(mismatches, operations_[index], index, actual);
      if (t == 0 && i % kClearRecordsEvery == 0) broker_.clearRecords();
    }
  });
  stop.store(true);
  creator.join();

  EXPECT_GT(creations.load(), 0);
  EXPECT_EQ(mismatches.load(), 0);
  EXPECT_EQ(broker_.liveObjectCount(), 0u);
}

}  // namespace
}  // namespace reliability
