// Requests: who owns the objects, when they are freed, how CMRelease and CMClone fit in, and the
// thread-local current request.
#include <thread>

#include "host_test_support.h"

namespace cmpihost {
namespace {

const CMPIBroker* mbOf(Broker& broker) { return broker.cmpi(); }

TEST(RequestTest, ObjectsAreFreedWhenTheRequestEnds) {
  Broker broker;
  {
    Request request(broker);
    const std::size_t base = request.liveObjectCount();  // its context and result
    EXPECT_EQ(base, 2u);
    CMPIObjectPath* path = CMNewObjectPath(mbOf(broker), "ns", "C", nullptr);
    CMPIInstance* instance = CMNewInstance(mbOf(broker), path, nullptr);
    CMSetProperty(instance, "P", "x", CMPI_chars);
    CMGetProperty(instance, "P", nullptr);  // the returned string is an object too
    EXPECT_EQ(request.liveObjectCount(), base + 3);
    EXPECT_EQ(broker.liveObjectCount(), base + 3);
  }
  EXPECT_EQ(broker.liveObjectCount(), 0u);
}

TEST(RequestTest, ObjectsOutsideRequestsBelongToTheBroker) {
  Broker broker;
  CMPIString* string = CMNewString(mbOf(broker), "broker's", nullptr);
  {
    Request request(broker);
    EXPECT_STREQ(CMGetCharPtr(string), "broker's");
  }
  EXPECT_EQ(broker.brokerOwnedObjectCount(), 1u);
  EXPECT_STREQ(CMGetCharPtr(string), "broker's");
  // Freed with the broker (checked by the leak sanitizer).
}

TEST(RequestTest, ReleaseBeforeTheEndDoesNotFreeTwice) {
  Broker broker;
  {
    Request request(broker);
    for (int i = 0; i < 10; ++i) {
      CMPIObjectPath* path = CMNewObjectPath(mbOf(broker), "ns", "C", nullptr);
      if (i % 2 == 0) {
        EXPECT_EQ(CMRelease(path).rc, CMPI_RC_OK);
      }
    }
    EXPECT_EQ(request.liveObjectCount(), 2u + 5u);
  }
  EXPECT_EQ(broker.liveObjectCount(), 0u);
}

TEST(RequestTest, ClonesBelongToTheScopeOfTheOriginal) {
  Broker broker;
  CMPIString* original = CMNewString(mbOf(broker), "broker's", nullptr);
  {
    Request request(broker);
    CMPIString* copy = CMClone(original, nullptr);
    ASSERT_NE(copy, nullptr);
    EXPECT_EQ(request.liveObjectCount(), 2u);
    EXPECT_EQ(broker.brokerOwnedObjectCount(), 2u);
  }
  EXPECT_EQ(broker.brokerOwnedObjectCount(), 2u);
}

TEST(RequestTest, ResultsSurviveTheRequest) {
  Broker broker;
  std::vector<ResultEvent> results;
  {
    Request request(broker);
    CMPIInstance* instance =
        CMNewInstance(mbOf(broker), CMNewObjectPath(mbOf(broker), "ns", "C", nullptr), nullptr);
    CMSetProperty(instance, "P", "value", CMPI_chars);
    CMReturnInstance(request.result(), instance);
    results = request.results();
  }
  ASSERT_EQ(results.size(), 1u);
  EXPECT_EQ(results[0].instance()->find("P")->asString(), "value");
}

TEST(RequestTest, IdsCountUp) {
  Broker broker;
  std::uint64_t first = 0;
  {
    Request request(broker);
    first = request.id();
    EXPECT_EQ(&request.broker(), &broker);
  }
  Request second(broker);
  EXPECT_GT(second.id(), first);
}

TEST(RequestTest, InputsLiveAsLongAsTheRequest) {
  Broker broker;
  Request request(broker);
  EXPECT_EQ(request.propertyList(std::nullopt), nullptr);
  const char** empty = request.propertyList(std::vector<std::string>{});
  ASSERT_NE(empty, nullptr);
  EXPECT_EQ(empty[0], nullptr);
  const char** list = request.propertyList(std::vector<std::string>{"A", "B"});
  EXPECT_STREQ(list[0], "A");
  EXPECT_STREQ(list[1], "B");
  EXPECT_EQ(list[2], nullptr);
  EXPECT_EQ(request.text(std::nullopt), nullptr);
  EXPECT_STREQ(request.text(std::string("role")), "role");
  EXPECT_STREQ(list[0], "A");  // earlier inputs stay valid
  CMPIObjectPath* classPath = request.classPath("KESTA_BlueLight");
  EXPECT_EQ(toObjectPathValue(classPath)->toString(), "root/cimv2:KESTA_BlueLight");
  CMPIInstance* instance = request.instance(InstanceValue(ObjectPathValue("ns", "C")));
  EXPECT_NE(instance, nullptr);
  EXPECT_STREQ(CMGetCharPtr(request.string("s")), "s");
  // Inputs are not provider calls.
  EXPECT_TRUE(request.calls().empty());
}

TEST(RequestTest, NestedRequestsAndOutOfOrderEnds) {
  Broker broker;
  auto outer = std::make_unique<Request>(broker);
  auto inner = std::make_unique<Request>(broker);
  CMNewString(mbOf(broker), "inner's", nullptr);
  EXPECT_EQ(inner->liveObjectCount(), 3u);
  outer.reset();  // ends first although it started first
  CMNewString(mbOf(broker), "still inner's", nullptr);
  EXPECT_EQ(inner->liveObjectCount(), 4u);
  inner.reset();
  CMNewString(mbOf(broker), "broker's", nullptr);
  EXPECT_EQ(broker.brokerOwnedObjectCount(), 1u);
}

TEST(RequestTest, ScopeGuardMakesARequestCurrentOnAnotherThread) {
  Broker broker;
  Request request(broker);
  std::thread worker([&] {
    CMNewString(mbOf(broker), "no request here", nullptr);
    {
      ScopeGuard guard(request);
      CMNewString(mbOf(broker), "the request's", nullptr);
    }
    CMNewString(mbOf(broker), "no request again", nullptr);
  });
  worker.join();
  EXPECT_EQ(request.liveObjectCount(), 3u);
  EXPECT_EQ(broker.brokerOwnedObjectCount(), 2u);
}

TEST(RequestTest, RequestsOfAnotherBrokerDoNotOwnThisBrokersObjects) {
  Broker one;
  Broker two;
  Request request(one);
  CMNewString(mbOf(two), "two's", nullptr);
  EXPECT_EQ(request.liveObjectCount(), 2u);
  EXPECT_EQ(two.brokerOwnedObjectCount(), 1u);
}

TEST(RequestTest, ReleasingEveryKindOfObject) {
  Broker broker;
  Request request(broker);
  const CMPIBroker* mb = mbOf(broker);
  // CMRelease evaluates its argument twice, so every object is made first.
  CMPIObjectPath* path = CMNewObjectPath(mb, "ns", "C", nullptr);
  CMPIString* string = CMNewString(mb, "s", nullptr);
  CMPIArray* array = CMNewArray(mb, 2, CMPI_uint8, nullptr);
  CMPIInstance* instance = CMNewInstance(mb, path, nullptr);
  CMPIArgs* args = CMNewArgs(mb, nullptr);
  CMPIDateTime* dateTime = CMNewDateTime(mb, nullptr);
  CMPIEnumeration* enumeration = CBEnumInstanceNames(mb, request.context(), path, nullptr);
  CMPIContext* context = CMClone(request.context(), nullptr);
  EXPECT_EQ(request.liveObjectCount(), 2u + 8u);
  EXPECT_EQ(CMRelease(string).rc, CMPI_RC_OK);
  EXPECT_EQ(CMRelease(array).rc, CMPI_RC_OK);
  EXPECT_EQ(CMRelease(instance).rc, CMPI_RC_OK);
  EXPECT_EQ(CMRelease(args).rc, CMPI_RC_OK);
  EXPECT_EQ(CMRelease(dateTime).rc, CMPI_RC_OK);
  EXPECT_EQ(CMRelease(enumeration).rc, CMPI_RC_OK);
  EXPECT_EQ(CMRelease(context).rc, CMPI_RC_OK);
  EXPECT_EQ(CMRelease(path).rc, CMPI_RC_OK);
  EXPECT_EQ(request.liveObjectCount(), 2u);
}

TEST(RequestDeathTest, EndingOnAnotherThreadAborts) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_DEATH(
      {
        Broker broker;
        auto request = std::make_unique<Request>(broker);
        std::thread other([&] { request.reset(); });
        other.join();
      },
      "must end on the thread that made it");
}

TEST(RequestDeathTest, BrokerEndingBeforeItsRequestsAborts) {
  GTEST_FLAG_SET(death_test_style, "threadsafe");
  EXPECT_DEATH(
      {
        auto broker = std::make_unique<Broker>();
        Request request(*broker);
        broker.reset();
      },
      "still alive");
}

}  // namespace
}  // namespace cmpihost
