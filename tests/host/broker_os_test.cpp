// CMPIBrokerExtFT: threads, keys, mutexes and conditions.
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <ctime>

#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;

using BrokerOsTest = HostTest;

void* addOne(void* argument) {
  static_cast<std::atomic<int>*>(argument)->fetch_add(1);
  return argument;
}

TEST_F(BrokerOsTest, ResolveFileName) {
  char* name = mb()->xft->resolveFileName("provider");
  ASSERT_NE(name, nullptr);
  EXPECT_STREQ(name, "libprovider.so");
  std::free(name);
  EXPECT_EQ(mb()->xft->resolveFileName(nullptr), nullptr);
}

TEST_F(BrokerOsTest, ThreadsRunAndJoin) {
  std::atomic<int> counter{0};
  void* thread = mb()->xft->newThread(addOne, &counter, 0);
  ASSERT_NE(thread, nullptr);
  void* result = nullptr;
  EXPECT_EQ(mb()->xft->joinThread(thread, &result), 0);
  EXPECT_EQ(result, &counter);
  EXPECT_EQ(counter.load(), 1);
  EXPECT_EQ(mb()->xft->newThread(nullptr, nullptr, 0), nullptr);
  EXPECT_EQ(mb()->xft->joinThread(nullptr, nullptr), EINVAL);
  EXPECT_EQ(mb()->xft->threadSleep(1), 0);
}

int onceCalls = 0;
void countOnce() { ++onceCalls; }

TEST_F(BrokerOsTest, ThreadOnce) {
  int once = 0;
  EXPECT_EQ(mb()->xft->threadOnce(&once, countOnce), 0);
  EXPECT_EQ(mb()->xft->threadOnce(&once, countOnce), 0);
  EXPECT_EQ(onceCalls, 1);
  EXPECT_EQ(mb()->xft->threadOnce(nullptr, countOnce), EINVAL);
}

TEST_F(BrokerOsTest, ThreadKeys) {
  pthread_key_t key;
  ASSERT_EQ(mb()->xft->createThreadKey(&key, nullptr), 0);
  int value = 5;
  EXPECT_EQ(mb()->xft->setThreadSpecific(key, &value), 0);
  EXPECT_EQ(mb()->xft->getThreadSpecific(key), &value);
  EXPECT_EQ(mb()->xft->destroyThreadKey(key), 0);
  EXPECT_EQ(mb()->xft->createThreadKey(nullptr, nullptr), EINVAL);
}

TEST_F(BrokerOsTest, MutexesNestAndConditionsTimeOut) {
  const CMPIBrokerExtFT* xft = mb()->xft;
  void* mutex = xft->newMutex(0);
  void* condition = xft->newCondition(0);
  ASSERT_NE(mutex, nullptr);
  ASSERT_NE(condition, nullptr);
  xft->lockMutex(mutex);
  xft->lockMutex(mutex);  // the same thread may lock again
  timespec deadline{};
  clock_gettime(CLOCK_REALTIME, &deadline);
  deadline.tv_nsec += 1000000;
  if (deadline.tv_nsec >= 1000000000) {
    deadline.tv_sec += 1;
    deadline.tv_nsec -= 1000000000;
  }
  xft->unlockMutex(mutex);
  EXPECT_EQ(xft->timedCondWait(condition, mutex, &deadline), ETIMEDOUT);
  xft->unlockMutex(mutex);
  EXPECT_EQ(xft->signalCondition(condition), 0);
  EXPECT_EQ(xft->condWait(nullptr, mutex), EINVAL);
  EXPECT_EQ(xft->timedCondWait(condition, mutex, nullptr), EINVAL);
  xft->lockMutex(nullptr);  // ignored
  xft->destroyCondition(condition);
  xft->destroyMutex(mutex);
}

struct Handshake {
  const CMPIBrokerExtFT* xft;
  void* mutex;
  void* condition;
  bool ready = false;
};

void* signalReady(void* argument) {
  auto* handshake = static_cast<Handshake*>(argument);
  handshake->xft->lockMutex(handshake->mutex);
  handshake->ready = true;
  handshake->xft->signalCondition(handshake->condition);
  handshake->xft->unlockMutex(handshake->mutex);
  return nullptr;
}

TEST_F(BrokerOsTest, ConditionWaitWakesUp) {
  const CMPIBrokerExtFT* xft = mb()->xft;
  Handshake handshake{xft, xft->newMutex(0), xft->newCondition(0)};
  xft->lockMutex(handshake.mutex);
  void* thread = xft->newThread(signalReady, &handshake, 0);
  while (!handshake.ready) EXPECT_EQ(xft->condWait(handshake.condition, handshake.mutex), 0);
  xft->unlockMutex(handshake.mutex);
  xft->joinThread(thread, nullptr);
  xft->destroyCondition(handshake.condition);
  xft->destroyMutex(handshake.mutex);
}

}  // namespace
}  // namespace cmpihost
