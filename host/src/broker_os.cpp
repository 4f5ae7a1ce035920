// CMPIBrokerExtFT: operating-system services (threads, keys, mutexes, conditions) on POSIX
// threads and the standard library. None of these functions receives the broker, so they are
// not recorded.
#include <cerrno>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <mutex>
#include <string>
#include <thread>

#include <pthread.h>

#include "broker_core.h"

namespace cmpihost::detail {

namespace {

// A provider's mutex may be locked again by the thread holding it (nested helper functions do
// that), so it is recursive; conditions then need the _any flavour.
using ProviderMutex = std::recursive_mutex;
using ProviderCondition = std::condition_variable_any;

char* resolveFileName(const char* fileName) {
  if (fileName == nullptr) return nullptr;
  const std::string resolved = "lib" + std::string(fileName) + ".so";
  char* out = static_cast<char*>(std::malloc(resolved.size() + 1));
  if (out != nullptr) std::memcpy(out, resolved.c_str(), resolved.size() + 1);
  return out;
}

void* newThread(void* (*start)(void*), void* parameter, int detached) {
  if (start == nullptr) return nullptr;
  pthread_t thread;
  if (pthread_create(&thread, nullptr, start, parameter) != 0) return nullptr;
  if (detached != 0) pthread_detach(thread);
  // CMPI hands threads over as pointers; a pthread_t is an integer here.
  return reinterpret_cast<void*>(  // NOLINT(performance-no-int-to-ptr)
      static_cast<std::uintptr_t>(thread));
}

pthread_t threadOf(void* handle) {
  return static_cast<pthread_t>(reinterpret_cast<std::uintptr_t>(handle));
}

int joinThread(void* thread, void** result) {
  if (thread == nullptr) return EINVAL;
  return pthread_join(threadOf(thread), result);
}

int exitThread(void* result) { pthread_exit(result); }

int cancelThread(void* thread) {
  if (thread == nullptr) return EINVAL;
  return pthread_cancel(threadOf(thread));
}

int threadSleep(CMPIUint32 milliseconds) {
  std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
  return 0;
}

int threadOnce(int* once, void (*init)(void)) {
  if (once == nullptr || init == nullptr) return EINVAL;
  // Recursive, so that an init function may itself use threadOnce for something else.
  static std::recursive_mutex onceMutex;
  std::lock_guard<std::recursive_mutex> lock(onceMutex);
  if (*once == 0) {
    init();
    *once = 1;
  }
  return 0;
}

int createThreadKey(pthread_key_t* key, void (*cleanup)(void*)) {
  if (key == nullptr) return EINVAL;
  return pthread_key_create(key, cleanup);
}

int destroyThreadKey(pthread_key_t key) { return pthread_key_delete(key); }

void* getThreadSpecific(pthread_key_t key) { return pthread_getspecific(key); }

int setThreadSpecific(pthread_key_t key, void* value) { return pthread_setspecific(key, value); }

void* newMutex(int /*options*/) { return new (std::nothrow) ProviderMutex(); }

void destroyMutex(void* mutex) { delete static_cast<ProviderMutex*>(mutex); }

void lockMutex(void* mutex) {
  if (mutex != nullptr) static_cast<ProviderMutex*>(mutex)->lock();
}

void unlockMutex(void* mutex) {
  if (mutex != nullptr) static_cast<ProviderMutex*>(mutex)->unlock();
}

void* newCondition(int /*options*/) { return new (std::nothrow) ProviderCondition(); }

void destroyCondition(void* condition) { delete static_cast<ProviderCondition*>(condition); }

int condWait(void* condition, void* mutex) {
  if (condition == nullptr || mutex == nullptr) return EINVAL;
  static_cast<ProviderCondition*>(condition)->wait(*static_cast<ProviderMutex*>(mutex));
  return 0;
}

int timedCondWait(void* condition, void* mutex, struct timespec* wait) {
  if (condition == nullptr || mutex == nullptr || wait == nullptr) return EINVAL;
  // `wait` is an absolute time on the real-time clock, as with pthread_cond_timedwait.
  const auto deadline = std::chrono::system_clock::time_point(
      std::chrono::duration_cast<std::chrono::system_clock::duration>(
          std::chrono::seconds(wait->tv_sec) + std::chrono::nanoseconds(wait->tv_nsec)));
  const std::cv_status status = static_cast<ProviderCondition*>(condition)->wait_until(
      *static_cast<ProviderMutex*>(mutex), deadline);
  return status == std::cv_status::timeout ? ETIMEDOUT : 0;
}

int signalCondition(void* condition) {
  if (condition == nullptr) return EINVAL;
  static_cast<ProviderCondition*>(condition)->notify_one();
  return 0;
}

}  // namespace

CMPIBrokerExtFT makeOsServiceTable(int version) {
  CMPIBrokerExtFT table = {version,         resolveFileName,  newThread,         joinThread,
                           exitThread,      cancelThread,     threadSleep,       threadOnce,
                           createThreadKey, destroyThreadKey, getThreadSpecific, setThreadSpecific,
                           newMutex,        destroyMutex,     lockMutex,         unlockMutex,
                           newCondition,    destroyCondition, condWait,          timedCondWait,
                           signalCondition};
  return table;
}

}  // namespace cmpihost::detail
