// Soak gate: the provider lives for months in its object manager, so a hundred thousand mixed
// operations on all four classes must leave resident memory where it was after warm-up, and
// every one of them must give what the same operation gave the first time.
#include <gtest/gtest.h>

#include <algorithm>
#include <iostream>
#include <numeric>

#include "ReliabilityWorkload.h"

namespace reliability {
namespace {

// Under a sanitizer one operation costs five to ten times as much (100,000 took 96 s of
// processor time under the address sanitizer), so 20,000 run there: the same mix, every path
// walked hundreds of times. Resident memory is not bounded under the address sanitizer, whose
// quarantine keeps freed blocks, nor under valgrind, which keeps its own bookkeeping; their leak
// checks at exit judge instead.
constexpr int kOperations = kAnySanitizer ? 20000 : 100000;
constexpr int kWarmUp = 10000;
constexpr long kResidentGrowthBoundKiB = 1024;

TEST(SoakTest, HundredThousandOperationsKeepResidentMemoryFlat) {
  World world;
  cmpihost::ProviderLibrary library(kLibraryPath);
  // No recording: an object manager keeps nothing of what a provider did.
  cmpihost::Broker broker(cmpihost::BrokerOptions{
      "cmpihost", 200, CMPI_MB_Class_0 | CMPI_MB_Supports_MemEnhancements, false});
  World::configure(broker);
  const ProviderMIs mis = createMIs(library, broker);
  const std::vector<Operation> operations = readOperations(broker, mis);

  std::vector<std::string> expected;
  expected.reserve(operations.size());
  for (const Operation& operation : operations) {
    expected.push_back(render(operation.run(broker, mis)));
  }

  const double start = now();
  const double startCpu = cpuSeconds();
  ProcessFigures warm;
  long peakKiB = 0;
  int differing = 0;
  std::size_t objects = 0;
  // Walks the list with a stride prime to its length, so that neighbours differ from round to
  // round.
  const std::size_t stride = 11;
  ASSERT_EQ(std::gcd(operations.size(), stride), 1u);
  std::size_t index = 0;
  for (int i = 1; i <= kOperations; ++i) {
    const cmpihost::Outcome outcome = operations[index].run(broker, mis);
    objects += handedOver(outcome);
    if (render(outcome) != expected[index] && ++differing <= 3) {
      ADD_FAILURE() << operations[index].name << " gave after " << i << " operations:\n"
                    << render(outcome) << "the first time:\n"
                    << expected[index];
    }
    index = (index + stride) % operations.size();
    if (i == kWarmUp) warm = measure();
    if (i > kWarmUp && i % 5000 == 0) peakKiB = std::max(peakKiB, measure().residentKiB);
  }
  const ProcessFigures last = measure();
  const double seconds = now() - start;
  const double cpu = cpuSeconds() - startCpu;
  cleanupMIs(broker, mis);

  std::cout << "[ figures  ] " << kOperations << " operations (" << objects
            << " objects handed over) in " << seconds << " s (" << cpu
            << " s of processor time); VmRSS after " << kWarmUp << " operations "
            << warm.residentKiB << " KiB, highest after that " << peakKiB << " KiB, at the end "
            << last.residentKiB << " KiB; fds " << warm.openFds << " -> " << last.openFds
            << ", threads " << warm.threads << " -> " << last.threads << std::endl;

  EXPECT_EQ(differing, 0);
  EXPECT_EQ(broker.liveObjectCount(), 0u);
  EXPECT_EQ(last.openFds, warm.openFds);
  EXPECT_EQ(last.threads, warm.threads);
  if (!kAddressSanitizer && !underValgrind()) {
    EXPECT_LE(peakKiB - warm.residentKiB, kResidentGrowthBoundKiB);
    EXPECT_LE(last.residentKiB - warm.residentKiB, kResidentGrowthBoundKiB);
  }
}

}  // namespace
}  // namespace reliability
