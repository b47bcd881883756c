// The probabilistic Hough transform: pixels vote in a random order, and as
// soon as a cell is strong enough the segment through the pixel is traced,
// taken away and its votes withdrawn. Everything it needs lives in the
// caller's state, so a call allocates nothing and repeats itself exactly.
#include <emmintrin.h>

#include <climits>
#include <cmath>
#include <cstdlib>
#include <cstring>

#include "core/alloc.h"
#include "core/status.h"
#include "kernels/simd.h"
#include "features/hough_kernels.h"

namespace zelcv {
namespace {

constexpr uint32_t kProbId = 0x48505242u;

// The record at the state's first 16-byte boundary; the tables follow it.
struct ProbState {
  uint32_t id;
  int32_t maxWidth;
  int32_t maxHeight;
  int32_t angles;
  int32_t maxRhos;  // rho cells of the largest ROI
  uint32_t seed;
  float drho;
  float dtheta;
  // angles cos and sin each, accumulator (angles x (maxRhos + 2)), point
  // list (maxWidth x maxHeight), mask (the same)
};
static_assert(sizeof(ProbState) == 32, "the state record is 32 bytes");

struct ProbLayout {
  int64_t cosOffset, sinOffset, accOffset, listOffset, maskOffset, total;
};

ProbLayout layoutOf(int64_t angles, int64_t rhos, int64_t width, int64_t height) {
  ProbLayout l;
  l.cosOffset = sizeof(ProbState);
  l.sinOffset = l.cosOffset + 4 * angles;
  l.accOffset = l.sinOffset + 4 * angles;
  l.listOffset = l.accOffset + 4 * angles * (rhos + 2);
  l.maskOffset = l.listOffset + 8 * width * height;
  l.total = l.maskOffset + width * height + 16;
  return l;
}

// The walk keeps a coordinate in 16-bit fixed point inside an int.
constexpr int kMaxSide = 32767;

int64_t stateBytes(ZeliSize roi, ZeliPoint_32f delta) {
  if (roi.width > kMaxSide || roi.height > kMaxSide) return int64_t(1) << 40;
  const int64_t r = hough::rhoCells(roi, delta.x), a = hough::angleCount(hough::kPi, delta.y);
  if (r < 0 || a < 1) return int64_t(1) << 40;
  return layoutOf(a, r, roi.width, roi.height).total;
}

ProbState* recordOf(ZeliHoughProbState* state) { return reinterpret_cast<ProbState*>(alignUp(state, 16)); }

// 64-bit xorshift*, upper half of the product.
struct Random {
  uint64_t s;
  explicit Random(uint32_t seed) : s(uint64_t(seed) ^ 0x9E3779B97F4A7C15ull) {
    if (!s) s = 0x9E3779B97F4A7C15ull;
  }
  uint32_t next() {
    s ^= s >> 12;
    s ^= s << 25;
    s ^= s >> 27;
    return uint32_t((s * 0x2545F4914F6CDD1Dull) >> 32);
  }
};

enum : uint8_t { kEmpty = 0, kSet = 1, kVoted = 2 };

struct Walker {
  int width, height;
  bool alongX;  // one pixel a step in x, y in 16-bit fixed point (or the reverse)
  int dx, dy;   // steps: 1 or -1 on the dominant axis, fixed point on the other
  int x0, y0;   // start, in the same representation
  int pixelX(int px) const { return alongX ? px : px >> 16; }
  int pixelY(int py) const { return alongX ? py >> 16 : py; }
};

Walker walkerFor(int x, int y, float theta, int width, int height) {
  // The direction along the line of normal angle theta.
  const float ax = -std::sin(theta), ay = std::cos(theta);
  Walker w{width, height, std::fabs(ax) > std::fabs(ay), 0, 0, 0, 0};
  const int shift = 16;
  if (w.alongX) {
    w.dx = ax > 0 ? 1 : -1;
    w.dy = int(std::lround(ay * (1 << shift) / std::fabs(ax)));
    w.x0 = x;
    w.y0 = (y << shift) + (1 << (shift - 1));
  } else {
    w.dy = ay > 0 ? 1 : -1;
    w.dx = int(std::lround(ax * (1 << shift) / std::fabs(ay)));
    w.x0 = (x << shift) + (1 << (shift - 1));
    w.y0 = y;
  }
  return w;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliHoughProbLineGetSize_8u_C1R)(ZeliSize roiSize, ZeliPoint_32f delta, int* stateSize) {
  if (ZelStatus s = checkSizeQuery(roiSize, stateSize)) return s;
  if (!hough::deltaValid(delta)) return zelStatusBadArgument;
  const int64_t bytes = stateBytes(roiSize, delta);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *stateSize = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliHoughProbLineInit_8u32f_C1R)(ZeliSize roiSize, ZeliPoint_32f delta, unsigned int seed,
                                             ZeliHoughProbState* state) {
  if (!state) return zelStatusNullPointer;
  if (ZelStatus s = checkSize(roiSize)) return s;
  if (!hough::deltaValid(delta)) return zelStatusBadArgument;
  if (stateBytes(roiSize, delta) > INT_MAX) return zelStatusBadSize;
  ProbState* st = recordOf(state);
  const int angles = int(hough::angleCount(hough::kPi, delta.y));
  *st = ProbState{kProbId, roiSize.width, roiSize.height, angles, int(hough::rhoCells(roiSize, delta.x)), seed,
                  delta.x, delta.y};
  uint8_t* base = reinterpret_cast<uint8_t*>(st);
  const ProbLayout l = layoutOf(angles, st->maxRhos, roiSize.width, roiSize.height);
  hough::trigTables(angles, 0.0f, delta.y, delta.x, reinterpret_cast<float*>(base + l.cosOffset),
                    reinterpret_cast<float*>(base + l.sinOffset));
  return zelStatusOk;
}

ZELCV_ENTRY(zeliHoughProbLine_8u32f_C1R)(const Zel8u* src, int srcStep, ZeliSize roiSize, int threshold,
                                         int lineLength, int lineGap, ZeliPoint* segments, int capacity, int* count,
                                         ZeliHoughProbState* state) {
  if (ZelStatus s = checkImages({image(src, srcStep)}, roiSize, {segments, count, state})) return s;
  ProbState* st = recordOf(state);
  if (st->id != kProbId) return zelStatusBadContext;
  if (roiSize.width > st->maxWidth || roiSize.height > st->maxHeight) return zelStatusBadSize;
  if (threshold < 1 || lineLength < 0 || lineGap < 0 || capacity < 0) return zelStatusBadArgument;

  const int w = roiSize.width, h = roiSize.height, angles = st->angles;
  const int rhos = int(hough::rhoCells(roiSize, st->drho)), stride = rhos + 2;
  uint8_t* base = reinterpret_cast<uint8_t*>(st);
  const ProbLayout l = layoutOf(angles, st->maxRhos, st->maxWidth, st->maxHeight);
  const float* cosTable = reinterpret_cast<const float*>(base + l.cosOffset);
  const float* sinTable = reinterpret_cast<const float*>(base + l.sinOffset);
  int* acc = reinterpret_cast<int*>(base + l.accOffset);
  ZeliPoint* list = reinterpret_cast<ZeliPoint*>(base + l.listOffset);
  uint8_t* mask = base + l.maskOffset;
  std::memset(acc, 0, sizeof(int) * size_t(angles) * stride);
  const int offset = 1 + (rhos - 1) / 2;

  int remaining = 0;
  const __m128i zero = _mm_setzero_si128(), set = _mm_set1_epi8(char(kSet));
  for (int y = 0; y < h; ++y) {
    const Zel8u* row = src + ptrdiff_t(y) * srcStep;
    uint8_t* m = mask + size_t(y) * w;
    int x = 0;
    for (; x + 16 <= w; x += 16) {
      const __m128i empty = _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(row + x)), zero);
      _mm_storeu_si128(reinterpret_cast<__m128i*>(m + x), _mm_andnot_si128(empty, set));
      for (unsigned bits = unsigned(_mm_movemask_epi8(empty)) ^ 0xFFFFu; bits; bits &= bits - 1)
        list[remaining++] = ZeliPoint{x + __builtin_ctz(bits), y};
    }
    for (; x < w; ++x) {
      m[x] = row[x] ? kSet : kEmpty;
      if (row[x]) list[remaining++] = ZeliPoint{x, y};
    }
  }

  Random random(st->seed);
  int written = 0;
  while (remaining > 0 && written < capacity) {
    const int pick = int(random.next() % uint32_t(remaining));
    const ZeliPoint p = list[pick];
    list[pick] = list[--remaining];
    uint8_t& here = mask[size_t(p.y) * w + p.x];
    if (here == kEmpty) continue;

    // Vote, and find the strongest cell among the pixel's own.
    const int bestAngle = hough::voteBest(acc, stride, offset, cosTable, sinTable, angles, p.x, p.y, threshold - 1);
    here = kVoted;
    if (bestAngle < 0) continue;

    // Walk both ways from the pixel, remembering the last set pixel.
    const float theta = float(bestAngle) * st->dtheta;
    const Walker walker = walkerFor(p.x, p.y, theta, w, h);
    ZeliPoint end[2] = {p, p};
    for (int k = 0; k < 2; ++k) {
      const int dx = k ? -walker.dx : walker.dx, dy = k ? -walker.dy : walker.dy;
      int gap = 0;
      for (int px = walker.x0, py = walker.y0;; px += dx, py += dy) {
        const int x = walker.pixelX(px), y = walker.pixelY(py);
        if (x < 0 || x >= w || y < 0 || y >= h) break;
        if (mask[size_t(y) * w + x] != kEmpty) {
          gap = 0;
          end[k] = ZeliPoint{x, y};
        } else if (++gap > lineGap) {
          break;
        }
      }
    }
    if (std::abs(end[1].x - end[0].x) < lineLength && std::abs(end[1].y - end[0].y) < lineLength) continue;

    // Take the segment's pixels away, withdrawing the votes of those that voted.
    for (int k = 0; k < 2; ++k) {
      const int dx = k ? -walker.dx : walker.dx, dy = k ? -walker.dy : walker.dy;
      for (int px = walker.x0, py = walker.y0;; px += dx, py += dy) {
        const int x = walker.pixelX(px), y = walker.pixelY(py);
        uint8_t& m = mask[size_t(y) * w + x];
        if (m == kVoted) hough::vote(acc, stride, offset, cosTable, sinTable, angles, x, y, -1);
        m = kEmpty;
        if (x == end[k].x && y == end[k].y) break;
      }
    }
    simd::storeOne(segments + 2 * written, end[0]);  // callers may pass any address
    simd::storeOne(segments + 2 * written + 1, end[1]);
    ++written;
  }
  *count = written;
  return remaining > 0 && written == capacity ? zelStatusOutputFull : zelStatusOk;
}
