// Kesta::getSystemName: KESTA_SYSTEM_NAME first, else the host's canonical name.
#include <gtest/gtest.h>
#include <netdb.h>
#include <unistd.h>

#include <climits>
#include <string>
#include <thread>
#include <vector>

#include "KestaCommonBase.h"
#include "PlatformTestSupport.h"

namespace {

using testsupport::ScopedEnv;

// What the resolver says about this host, found independently of the code under test.
std::string expectedHostName() {
  char host[HOST_NAME_MAX + 1] = {};
  ::gethostname(host, sizeof host - 1);
  addrinfo hints = {};
  hints.ai_flags = AI_CANONNAME;
  hints.ai_socktype = SOCK_STREAM;
  addrinfo* found = nullptr;
  std::string name = host;
  if (::getaddrinfo(host, nullptr, &hints, &found) == 0) {
    if (found->ai_canonname != nullptr && found->ai_canonname[0] != '\0') {
      name = found->ai_canonname;
    }
    ::freeaddrinfo(found);
  }
  return name;
}

TEST(SystemName, TakesTheEnvironmentVariable) {
  ScopedEnv name("KESTA_SYSTEM_NAME", "server7.example.test");
  EXPECT_EQ(Kesta::getSystemName(), "server7.example.test");
}

TEST(SystemName, ReadsTheVariableOnEveryCall) {
  {
    ScopedEnv name("KESTA_SYSTEM_NAME", "first");
    EXPECT_EQ(Kesta::getSystemName(), "first");
  }
  {
    ScopedEnv name("KESTA_SYSTEM_NAME", "second");
    EXPECT_EQ(Kesta::getSystemName(), "second");
  }
}

TEST(SystemName, UsesTheCanonicalHostNameWithoutTheVariable) {
  ScopedEnv name("KESTA_SYSTEM_NAME", std::nullopt);
  const std::string systemName = Kesta::getSystemName();
  EXPECT_FALSE(systemName.empty());
  EXPECT_EQ(systemName, expectedHostName());
}

TEST(SystemName, IgnoresAnEmptyVariable) {
  ScopedEnv name("KESTA_SYSTEM_NAME", "");
  EXPECT_EQ(Kesta::getSystemName(), expectedHostName());
}

TEST(SystemName, ConcurrentCallersAgree) {
  ScopedEnv name("KESTA_SYSTEM_NAME", std::nullopt);
  const std::string expected = expectedHostName();
  std::vector<std::string> results(8);
  std::vector<std::thread> threads;
  threads.reserve(results.size());
  for (std::string& result : results) {
    threads.emplace_back([&result] {
      for (int round = 0; round < 100; ++round) {
        result = Kesta::getSystemName();
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  for (const std::string& result : results) {
    EXPECT_EQ(result, expected);
  }
}

}  // namespace
