// FAST corners: a centre is a corner when an arc of the discrete circle
// around it is all brighter or all darker than the centre by more than the
// threshold. Sixteen (with AVX2 32) centres are tested at once: four compass
// pixels reject most of them (an arc of more than half the circle covers two
// of them), the survivors get run lengths of brighter and darker pixels;
// scores are computed for corners only. Suppression needs the scores of the
// rows above and below, so the rows are finished one row late from a ring of
// three; a row without corners is finished without looking at it.
#include <emmintrin.h>

#include <climits>
#include <cstring>

#include "core/alloc.h"
#include "core/load.h"
#include "core/status.h"
#include "kernels/simd.h"
#include "features/fast_kernels.h"

namespace zelcv {
namespace {

constexpr uint32_t kFastId = 0x46415354u;

struct FastState {
  uint32_t id;
  int32_t radius;
  int32_t arc;
  int32_t threshold;
  int32_t suppression;
  int32_t reserved[3];
};
static_assert(sizeof(FastState) == 32, "the state record is 32 bytes");

int64_t fastBufferBytes(int width) { return 3 * (int64_t(width) + 2) + 64; }

const FastState* stateOf(const ZeliFastNState* state) {
  return reinterpret_cast<const FastState*>(alignUp(const_cast<ZeliFastNState*>(state), 16));
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliFastNGetSize)(int* stateSize) {
  if (!stateSize) return zelStatusNullPointer;
  *stateSize = int(sizeof(FastState) + 16);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliFastNInit)(int circleRadius, int arcLength, int threshold, int suppression, ZeliFastNState* state) {
  if (!state) return zelStatusNullPointer;
  if (circleRadius < 1 || circleRadius > 3) return zelStatusBadArgument;
  const int n = 4 * circleRadius + 4;
  if (arcLength < n / 2 + 1 || arcLength > n) return zelStatusBadArgument;
  if (threshold < 0 || threshold > 255) return zelStatusBadArgument;
  if (suppression != 0 && suppression != 1) return zelStatusBadArgument;
  auto* record = reinterpret_cast<FastState*>(alignUp(state, 16));
  *record = FastState{kFastId, circleRadius, arcLength, threshold, suppression, {0, 0, 0}};
  return zelStatusOk;
}

ZELCV_ENTRY(zeliFastNGetBufferSize)(ZeliSize roiSize, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, bufferSize)) return s;
  const int64_t bytes = fastBufferBytes(roiSize.width);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliFastN_8u_C1R)(const Zel8u* src, int srcStep, Zel8u* dstCorner, int dstCornerStep, Zel8u* dstScore,
                              int dstScoreStep, ZeliSize roiSize, const ZeliFastNState* state, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dstCorner, dstCornerStep), image(dstScore, dstScoreStep)},
                                roiSize, {state, buffer}))
    return s;
  const FastState* st = stateOf(state);
  if (st->id != kFastId) return zelStatusBadContext;
  if (fastBufferBytes(roiSize.width) > INT_MAX) return zelStatusBadSize;

  const int w = roiSize.width, h = roiSize.height, r = st->radius;
  const fast::Circle circle = fast::makeCircle(r, srcStep);
  const size_t stride = size_t(w) + 2;
  Zel8u* ring = alignUp(buffer, 16);
  // Ring row of image row y (y may be -1 .. h): slot (y + 3) % 3, one zero
  // column on each side.
  auto ringRow = [&](int y) { return ring + size_t((y + 3) % 3) * stride + 1; };
  const bool wide = useAvx2Kernels();
  // Corners in each ring slot; -1 while the slot may hold anything. A slot
  // is cleared only when it holds corners.
  int found[3] = {-1, -1, -1};
  auto rawRow = [&](int y) {
    Zel8u* out = ringRow(y);
    int& n = found[(y + 3) % 3];
    if (n) std::memset(out - 1, 0, stride);
    n = 0;
    if (y < r || y >= h - r) return;
    const Zel8u* row = src + ptrdiff_t(y) * srcStep;
    n = wide ? avx2::fastScoreRow(circle, row, w, st->threshold, st->arc, out)
             : fast::scoreRow<>(circle, row, w, st->threshold, st->arc, out);
  };
  rawRow(-1);
  rawRow(0);
  for (int y = 0; y < h; ++y) {
    rawRow(y + 1);
    const Zel8u* up = ringRow(y - 1);
    const Zel8u* mid = ringRow(y);
    const Zel8u* down = ringRow(y + 1);
    Zel8u* corner = dstCorner + ptrdiff_t(y) * dstCornerStep;
    Zel8u* score = dstScore + ptrdiff_t(y) * dstScoreStep;
    std::memset(corner, 0, size_t(w));
    std::memset(score, 0, size_t(w));
    if (!found[(y + 3) % 3]) continue;
    for (int x = 0; x < w; ++x) {
      // Sixteen pixels without a corner at once.
      if (x + 16 <= w && !_mm_movemask_epi8(_mm_cmpeq_epi8(
                             _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(mid + x)),
                                            _mm_setzero_si128()),
                             _mm_setzero_si128()))) {
        x += 15;
        continue;
      }
      if (!mid[x]) continue;
      const int s = mid[x] - 1;
      if (st->suppression) {
        // Neighbours' scores, 0 for pixels that are not corners.
        auto nb = [](Zel8u v) { return v ? v - 1 : 0; };
        if (!(s > nb(up[x - 1]) && s > nb(up[x]) && s > nb(up[x + 1]) && s > nb(mid[x - 1]) && s > nb(mid[x + 1]) &&
              s > nb(down[x - 1]) && s > nb(down[x]) && s > nb(down[x + 1])))
          continue;
      }
      corner[x] = 255;
      score[x] = Zel8u(s);
    }
  }
  return zelStatusOk;
}

ZELCV_ENTRY(zeliFastN2DToVec_8u)(const Zel8u* srcCorner, int srcCornerStep, const Zel8u* srcScore, int srcScoreStep,
                                 ZeliSize roiSize, ZeliPoint* points, Zel8u* scores, int capacity, int* count) {
  if (ZelStatus s = checkImages({image(srcCorner, srcCornerStep), image(srcScore, srcScoreStep)}, roiSize,
                                {points, scores, count}))
    return s;
  if (capacity < 0) return zelStatusBadArgument;
  int written = 0;
  for (int y = 0; y < roiSize.height; ++y) {
    const Zel8u* c = srcCorner + ptrdiff_t(y) * srcCornerStep;
    const Zel8u* s = srcScore + ptrdiff_t(y) * srcScoreStep;
    for (int x = 0; x < roiSize.width; ++x) {
      // Corners are sparse: skip 64 (then 16) empty pixels at once.
      auto load = [&](int at) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(c + at)); };
      while (x + 64 <= roiSize.width &&
             _mm_movemask_epi8(_mm_cmpeq_epi8(_mm_or_si128(_mm_or_si128(load(x), load(x + 16)),
                                                           _mm_or_si128(load(x + 32), load(x + 48))),
                                              _mm_setzero_si128())) == 0xFFFF)
        x += 64;
      if (x + 16 <= roiSize.width &&
          _mm_movemask_epi8(_mm_cmpeq_epi8(load(x), _mm_setzero_si128())) == 0xFFFF) {
        x += 15;
        continue;
      }
      if (x >= roiSize.width) break;
      if (!c[x]) continue;
      if (written == capacity) {
        *count = written;
        return zelStatusOutputFull;
      }
      simd::storeOne(points + written, ZeliPoint{x, y});  // callers may pass any address
      scores[written] = s[x];
      ++written;
    }
  }
  *count = written;
  return zelStatusOk;
}
