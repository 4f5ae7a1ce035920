// CMPIBrokerMemFT: broker-managed memory, marks and early freeing.
#include <cstring>

#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;

using BrokerMemoryTest = HostTest;

TEST_F(BrokerMemoryTest, MemoryIsUsableAndFreedWithTheRequest) {
  const CMPIBrokerMemFT* mft = mb()->mft;
  auto* block = static_cast<char*>(mft->cmpiMalloc(mb(), 64));
  ASSERT_NE(block, nullptr);
  std::memset(block, 'x', 64);
  auto* zeroed = static_cast<int*>(mft->cmpiCalloc(mb(), 4, sizeof(int)));
  ASSERT_NE(zeroed, nullptr);
  EXPECT_EQ(zeroed[0] + zeroed[3], 0);
  char* copy = mft->cmpiStrDup(mb(), "duplicate");
  EXPECT_STREQ(copy, "duplicate");
  EXPECT_EQ(request->liveObjectCount(), 2u + 3u);  // context, result and the three blocks
  // Nothing freed explicitly: the request's end frees them (checked by the leak sanitizer).
}

TEST_F(BrokerMemoryTest, ReallocAndFree) {
  const CMPIBrokerMemFT* mft = mb()->mft;
  auto* block = static_cast<char*>(mft->cmpiMalloc(mb(), 4));
  std::memcpy(block, "abc", 4);
  auto* bigger = static_cast<char*>(mft->cmpiRealloc(mb(), block, 4096));
  ASSERT_NE(bigger, nullptr);
  EXPECT_STREQ(bigger, "abc");
  const std::size_t before = request->liveObjectCount();
  mft->cmpiFree(mb(), bigger);
  EXPECT_EQ(request->liveObjectCount(), before - 1);
  // Freeing what is not ours, or null, is ignored.
  int local = 0;
  mft->cmpiFree(mb(), &local);
  mft->cmpiFree(mb(), nullptr);
  EXPECT_EQ(mft->cmpiRealloc(mb(), &local, 8), nullptr);
  void* fresh = mft->cmpiRealloc(mb(), nullptr, 8);
  EXPECT_NE(fresh, nullptr);
  EXPECT_EQ(mft->cmpiCalloc(mb(), static_cast<size_t>(-1), 16), nullptr);
  EXPECT_EQ(mft->cmpiStrDup(mb(), nullptr), nullptr);
}

TEST_F(BrokerMemoryTest, MarkAndReleaseFreeWhatCameAfter) {
  const CMPIBrokerMemFT* mft = mb()->mft;
  CMPIString* kept = CMNewString(mb(), "kept", nullptr);
  const std::size_t before = request->liveObjectCount();
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIGcStat* outer = mft->mark(mb(), &rc);
  ASSERT_NE(outer, nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  CMNewString(mb(), "outer", nullptr);
  CMPIGcStat* inner = mft->mark(mb(), nullptr);
  CMNewString(mb(), "inner", nullptr);
  mft->cmpiMalloc(mb(), 10);
  EXPECT_EQ(mft->release(mb(), inner).rc, CMPI_RC_OK);
  EXPECT_EQ(request->liveObjectCount(), before + 2);  // the outer mark and "outer"
  EXPECT_EQ(mft->release(mb(), outer).rc, CMPI_RC_OK);
  EXPECT_EQ(request->liveObjectCount(), before);
  EXPECT_STREQ(CMGetCharPtr(kept), "kept");
  // A mark cannot be released twice, and anything else is not a mark.
  EXPECT_EQ(mft->release(mb(), outer).rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(mft->release(mb(), nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(BrokerMemoryTest, ReleaseKeepsTheRequestsContextAndResult) {
  CMPIGcStat* mark = mb()->mft->mark(mb(), nullptr);
  mb()->mft->release(mb(), mark);
  EXPECT_EQ(CMGetContextEntryCount(request->context(), nullptr), 3u);
  EXPECT_EQ(CMReturnDone(request->result()).rc, CMPI_RC_OK);
}

TEST_F(BrokerMemoryTest, FreeFunctionsReleaseObjects) {
  const CMPIBrokerMemFT* mft = mb()->mft;
  const std::size_t before = request->liveObjectCount();
  mft->freeInstance(mb(), newInstance("ns", "C"));  // its path stays: it is a separate object
  mft->freeObjectPath(mb(), newPath("ns", "C"));
  mft->freeArgs(mb(), CMNewArgs(mb(), nullptr));
  mft->freeString(mb(), CMNewString(mb(), "x", nullptr));
  mft->freeArray(mb(), CMNewArray(mb(), 1, CMPI_uint8, nullptr));
  mft->freeDateTime(mb(), CMNewDateTime(mb(), nullptr));
  mft->freeSelectExp(mb(), nullptr);
  EXPECT_EQ(request->liveObjectCount(), before + 1);
  // Null pointers and null handles are ignored.
  mft->freeInstance(mb(), nullptr);
  CMPIString* broken = CMNewString(mb(), "x", nullptr);
  broken->hdl = nullptr;
  mft->freeString(mb(), broken);
  EXPECT_EQ(request->liveObjectCount(), before + 2);
}

}  // namespace
}  // namespace cmpihost
