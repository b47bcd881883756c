// The store-mode rule and the row driver that the streaming kernels share.
#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <vector>

#include "arith/store_mode.h"
#include "kernels/row_driver.h"
#include "support/fault_injection.h"

namespace {

using zelcv::StoreMode;

TEST(StoreMode, StreamsFromTheCacheSizeUpAndWhenTheQueryFails) {
  zeltest::FaultInjection faults;
  const ZeliSize roi = {40, 30};  // 12 bytes per pixel: 14400 bytes touched
  faults.setCacheAnswer(0, 14401);
  EXPECT_EQ(zelcv::chooseStoreMode(12, roi), StoreMode::Ordinary);
  faults.setCacheAnswer(0, 14400);
  EXPECT_EQ(zelcv::chooseStoreMode(12, roi), StoreMode::Streaming);
  faults.setCacheAnswer(0, 14399);
  EXPECT_EQ(zelcv::chooseStoreMode(12, roi), StoreMode::Streaming);
  // A failed query leaves the size at 0, whatever status it reports.
  faults.setCacheAnswer(-1, 0);
  EXPECT_EQ(zelcv::chooseStoreMode(12, {1, 1}), StoreMode::Streaming);
  faults.setCacheAnswer(5, 0);
  EXPECT_EQ(zelcv::chooseStoreMode(1, {1, 1}), StoreMode::Streaming);
  EXPECT_EQ(faults.cacheQueries(), 5);
}

TEST(StoreMode, BytesTouchedAreCountedIn64Bits) {
  zeltest::FaultInjection faults;
  faults.setCacheAnswer(0, INT_MAX);
  // 13 x 65536 x 65536 wraps to 0 in 32 bits.
  EXPECT_EQ(zelcv::chooseStoreMode(13, {65536, 65536}), StoreMode::Streaming);
  EXPECT_EQ(zelcv::chooseStoreMode(1, {46341, 46341}), StoreMode::Streaming);  // just above INT_MAX
  EXPECT_EQ(zelcv::chooseStoreMode(1, {46340, 46340}), StoreMode::Ordinary);
  EXPECT_EQ(zelcv::storeModeFor(int64_t(INT_MAX), INT_MAX), StoreMode::Streaming);
  EXPECT_EQ(zelcv::storeModeFor(int64_t(INT_MAX) - 1, INT_MAX), StoreMode::Ordinary);
}

// A row that records what the driver asked of it. kAlign is the alignment its
// blocks need (a wider instruction set's); parts are always 16 bytes.
struct Visits {
  std::vector<int> count;  // per pixel
  int singles = 0, blocks = 0, parts = 0;
  int partsBeforeBlocks = 0, partsAfterBlocks = 0;
  int firstVector = -1, nextVector = -1;  // vector steps must be contiguous
  int misalignedVectors = 0, misalignedBlocks = 0, gaps = 0, streamed = 0;
};

template <typename T, int kAlign>
struct RecordingRow {
  static constexpr int kPart = 16 / int(sizeof(T));
  static constexpr int kBlock = kAlign / 16 * 4 * kPart;
  static constexpr int kBlockAlign = kAlign;
  const T* row;
  Visits* v;

  const T* written() const { return row; }
  void one(int x) {
    ++v->count[x];
    ++v->singles;
  }
  template <StoreMode M>
  void block(int x) {
    ++v->blocks;
    if (reinterpret_cast<uintptr_t>(row + x) % kAlign != 0) ++v->misalignedBlocks;
    vector<M>(x, kBlock);
  }
  template <StoreMode M>
  void part(int x) {
    ++v->parts;
    ++(v->blocks ? v->partsAfterBlocks : v->partsBeforeBlocks);
    vector<M>(x, kPart);
  }
  template <StoreMode M>
  void vector(int x, int n) {
    if (reinterpret_cast<uintptr_t>(row + x) % 16 != 0) ++v->misalignedVectors;
    if (M == StoreMode::Streaming) ++v->streamed;
    if (v->firstVector < 0) v->firstVector = x;
    if (v->nextVector >= 0 && x != v->nextVector) ++v->gaps;
    v->nextVector = x + n;
    for (int i = 0; i < n; ++i) ++v->count[x + i];
  }
};

// Every pixel exactly once; single pixels up to the first 16-byte boundary,
// then contiguous aligned vectors (parts until the block alignment, whole
// blocks, then fewer than a block's worth of parts), then fewer than a part's
// worth of single pixels.
template <typename T, int kAlign>
void checkDriver(StoreMode mode) {
  using Row = RecordingRow<T, kAlign>;
  alignas(64) static T buffer[400];
  for (int offset = 0; offset < 64 / int(sizeof(T)); ++offset)
    for (int width = 1; width <= 300; width += width < 140 ? 1 : 7) {
      SCOPED_TRACE(::testing::Message() << "offset " << offset << ", width " << width);
      Visits v;
      v.count.assign(width, 0);
      zelcv::driveRows(mode, width, 1, [&](int) { return Row{buffer + offset, &v}; });
      for (int c : v.count) ASSERT_EQ(c, 1);
      const int toBoundary = (16 - offset * int(sizeof(T)) % 16) % 16 / int(sizeof(T));
      const int head = toBoundary < width ? toBoundary : width;
      const int vectorPixels = (width - head) / Row::kPart * Row::kPart;
      EXPECT_EQ(v.blocks * Row::kBlock + v.parts * Row::kPart, vectorPixels);
      if (v.blocks) {
        EXPECT_LT(v.partsBeforeBlocks, kAlign / 16);
        EXPECT_LT(v.partsAfterBlocks, Row::kBlock / Row::kPart);
      } else {
        // No block fitted after the lead parts.
        EXPECT_LT(vectorPixels, Row::kBlock + (kAlign / 16 - 1) * Row::kPart);
      }
      EXPECT_EQ(v.singles, width - vectorPixels);
      EXPECT_EQ(v.firstVector, vectorPixels ? head : -1);
      EXPECT_EQ(v.misalignedVectors, 0);
      EXPECT_EQ(v.misalignedBlocks, 0);
      EXPECT_EQ(v.gaps, 0);
      EXPECT_EQ(v.streamed, mode == StoreMode::Streaming ? v.blocks + v.parts : 0);
    }
}

TEST(RowDriver, VisitsEveryPixelOnceWithAlignedVectors) {
  checkDriver<float, 16>(StoreMode::Ordinary);
  checkDriver<float, 16>(StoreMode::Streaming);
  checkDriver<uint16_t, 16>(StoreMode::Ordinary);
  checkDriver<uint8_t, 16>(StoreMode::Streaming);
}

TEST(RowDriver, WideBlocksStartAtTheirAlignment) {
  checkDriver<float, 32>(StoreMode::Ordinary);
  checkDriver<float, 32>(StoreMode::Streaming);
  checkDriver<uint16_t, 32>(StoreMode::Streaming);
  checkDriver<uint8_t, 32>(StoreMode::Ordinary);
}

}  // namespace
