// The library frame through its exported interface: the export table, the
// version record, the shared release routines and fault injection.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <map>
#include <string>

#include "support/exports.h"
#include "support/fault_injection.h"
#include "zelcore.h"
#include "zelcv.h"

namespace {

using zeltest::exportListing;

TEST(ExportList, IsSortedByteWiseAndUnique) {
  const auto& listing = exportListing();
  ASSERT_FALSE(listing.empty());
  for (size_t i = 1; i < listing.size(); ++i)
    EXPECT_LT(std::strcmp(listing[i - 1].name, listing[i].name), 0) << listing[i].name;
}

TEST(ExportList, LibraryExportsExactlyTheListedNames) {
  std::string path = zeltest::zelcvLibraryPath();
  ASSERT_FALSE(path.empty());
  std::vector<std::string> defined = zeltest::definedDynamicSymbols(path);
  std::sort(defined.begin(), defined.end());
  std::vector<std::string> listed;
  for (const auto& e : exportListing()) listed.emplace_back(e.name);
  EXPECT_EQ(defined, listed);
}

// Each export is one indirect jump through slot i of one table, and names of
// an alias group reach the same implementation.
TEST(ExportList, StubsJumpThroughConsecutiveSlotsSharedByAliases) {
  const auto& listing = exportListing();
  const void* const* firstSlot = nullptr;
  std::map<std::string, const void*> implementationOf;
  for (size_t i = 0; i < listing.size(); ++i) {
    SCOPED_TRACE(listing[i].name);
    const void* stub = zeltest::exportedAddress(listing[i].name);
    ASSERT_NE(stub, nullptr);
    const void* const* slot = zeltest::stubSlot(stub);
    ASSERT_NE(slot, nullptr) << "not a forwarding stub";
    if (i == 0) firstSlot = slot;
    EXPECT_EQ(slot, firstSlot + i);
    auto known = implementationOf.find(listing[i].implementation);
    if (known == implementationOf.end()) {
      implementationOf[listing[i].implementation] = *slot;
    } else {
      EXPECT_EQ(*slot, known->second);
    }
  }
}

TEST(Version, RecordIsStaticAndExact) {
  const ZelLibraryVersion* v = zelcvGetLibVersion();
  ASSERT_NE(v, nullptr);
  EXPECT_EQ(v, zelcvGetLibVersion());
  EXPECT_EQ(v->major, 8);
  EXPECT_EQ(v->minor, 2);
  EXPECT_EQ(v->majorBuild, 1);
  EXPECT_EQ(v->build, 44077);
  EXPECT_EQ(std::memcmp(v->targetCpu, "k4\0\0", 4), 0);
  EXPECT_STREQ(v->targetCpu, "k4");
  EXPECT_STREQ(v->name, "zelCV SSE2 (k4)");
  EXPECT_STREQ(v->version, "8.2.1 (r44077)");
  EXPECT_STREQ(v->buildDate, "Oct  9 2014");
}

// Every single-block Free name: null is an error, a block goes back to
// zelFree (seen here through the interposed support library).
TEST(Release, SingleBlockFreeNames) {
  using FreeFn = ZelStatus (*)(void*);
  for (const auto& e : exportListing()) {
    std::string impl = e.implementation;
    if (impl != "releaseSingleBlock" && impl != "releasePyramidLayer") continue;
    SCOPED_TRACE(e.name);
    auto release = reinterpret_cast<FreeFn>(const_cast<void*>(zeltest::exportedAddress(e.name)));
    ASSERT_NE(release, nullptr);
    zeltest::FaultInjection faults;
    EXPECT_EQ(release(nullptr), zelStatusNullPointer);
    EXPECT_EQ(faults.releases(), 0);
    void* block = zelMalloc(100);
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(release(block), zelStatusOk);
    EXPECT_EQ(faults.releases(), 1);
    EXPECT_EQ(faults.lastRelease(), block);
    EXPECT_EQ(faults.liveBlocks(), 0);
  }
}

TEST(FaultInjection, InterposesTheSupportLibrary) {
  zeltest::FaultInjection faults;
  faults.failAllocationsFrom(1);
  void* first = zelMalloc(16);
  EXPECT_NE(first, nullptr);
  EXPECT_EQ(zelMalloc(16), nullptr);
  zelFree(first);
  EXPECT_EQ(faults.allocations(), 2);
  EXPECT_EQ(faults.liveBlocks(), 0);
  faults.setCacheAnswer(-1, 0);
  int bytes = 7;
  EXPECT_EQ(zelGetMaxCacheSizeB(&bytes), -1);
  EXPECT_EQ(bytes, 7);
  faults.setCacheAnswer(0, 4096);
  EXPECT_EQ(zelGetMaxCacheSizeB(&bytes), 0);
  EXPECT_EQ(bytes, 4096);
  EXPECT_EQ(faults.cacheQueries(), 2);
}

// The library chooses its kernels from the features it sees at load: the
// interposed query must be the one it called, or a run meant for the
// baseline kernels would test the AVX2 ones again.
TEST(FaultInjection, ReachesTheLoadRoutine) {
  EXPECT_GE(zeltest::cpuFeatureQueriesSinceStart(), 1);
  if (const char* keep = std::getenv("ZELTEST_CPU_FEATURES")) {
    EXPECT_EQ(zelGetEnabledCpuFeatures() & ~uint32_t(std::strtoul(keep, nullptr, 0)), 0u);
  }
}

}  // namespace
