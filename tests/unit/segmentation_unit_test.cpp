// The vector forms of the segmentation kernels against their plain forms:
// run scanning and run linking of the labelling, and the row step of
// boundary marking, over random rows, lengths, start offsets and values.
#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <vector>

#include "segment/label_markers.h"
#include "segment/segment_bounds.h"

namespace {

using zelcv::runs::Layout;

template <typename T>
void runsAgree(uint32_t seed) {
  std::mt19937 rng(seed);
  for (int i = 0; i < 400; ++i) {
    const int w = 1 + int(rng() % 90), h = 1 + int(rng() % 6), offset = int(rng() % 8);
    const int step = (w + int(rng() % 4)) * int(sizeof(T));
    // Long runs of few values, so that the vector compares see whole blocks.
    std::vector<uint8_t> block(size_t(step) * h + 16 * sizeof(T) + 64);
    T* img = reinterpret_cast<T*>(block.data() + offset * sizeof(T));
    const int values = 1 + int(rng() % 3);
    for (int y = 0; y < h; ++y) {
      T* row = reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(img) + size_t(step) * y);
      T v = T(rng() % (values + 1));
      for (int x = 0; x < w; ++x) {
        if (rng() % 23 == 0) v = T(rng() % (values + 1));
        row[x] = sizeof(T) == 2 && v ? T(v * 257) : v;  // 16-bit values that differ in both bytes
      }
    }
    for (bool conn8 : {false, true}) {
      std::vector<uint8_t> bufA(zelcv::runs::bufferBytes(w, h).value()), bufB(bufA.size());
      const Layout a = zelcv::runs::place(bufA.data(), h), b = zelcv::runs::place(bufB.data(), h);
      const int32_t na = zelcv::runs::findEqualRuns<T, false>(img, step, w, h, conn8, a);
      const int32_t nb = zelcv::runs::findEqualRuns<T, true>(img, step, w, h, conn8, b);
      ASSERT_EQ(na, nb);
      ASSERT_EQ(std::memcmp(a.rowStart, b.rowStart, sizeof(int32_t) * size_t(h + 1)), 0);
      for (int32_t r = 0; r < na; ++r) {
        ASSERT_EQ(a.runs[r].x0, b.runs[r].x0);
        ASSERT_EQ(a.runs[r].x1, b.runs[r].x1);
      }
      // Same regions: the resolved labels agree run by run.
      ASSERT_EQ(zelcv::runs::resolveLabels(a.runs, na, 1, 1 << 30), zelcv::runs::resolveLabels(b.runs, nb, 1, 1 << 30));
      for (int32_t r = 0; r < na; ++r) ASSERT_EQ(a.runs[r].parent, b.runs[r].parent);
    }
  }
}

TEST(SegmentationKernels, VectorRunScanAgreesWithPlain) {
  runsAgree<uint8_t>(1);
  runsAgree<uint16_t>(2);
}

template <typename T>
void boundsAgree(uint32_t seed) {
  std::mt19937 rng(seed);
  for (int i = 0; i < 600; ++i) {
    const int w = 1 + int(rng() % 80), offset = int(rng() % 5);
    std::vector<T> rowBlock(size_t(w) + 8), belowBlock(size_t(w) + 8);
    T* row = rowBlock.data() + offset;
    T* below = belowBlock.data() + offset;
    for (int x = 0; x < w; ++x) {
      row[x] = T(rng() % 9 == 0 ? rng() % 3 : 1);
      below[x] = T(rng() % 9 == 0 ? rng() % 3 : 1);
    }
    const bool conn8 = rng() % 2, last = rng() % 4 == 0;
    std::vector<T> a(row, row + w), b(row, row + w);
    zelcv::bounds::markRow<T, false>(a.data(), last ? nullptr : below, w, T(7), conn8);
    zelcv::bounds::markRow<T, true>(b.data(), last ? nullptr : below, w, T(7), conn8);
    ASSERT_EQ(a, b) << "width " << w << " conn8 " << conn8;
  }
}

TEST(SegmentationKernels, VectorBoundaryRowAgreesWithPlain) {
  boundsAgree<uint8_t>(3);
  boundsAgree<uint16_t>(4);
  boundsAgree<int32_t>(5);
}

}  // namespace
