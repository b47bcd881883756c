// Boundary marking: a pixel that differs from its right or lower neighbour
// (8-connected: also the lower diagonals) takes the marking value. Rows run
// top to bottom and left to right, and every compared neighbour lies to the
// right or below, so the comparisons see the values on entry without a copy.
// The vector form compares whole blocks and writes a block only after reading
// its right neighbours, which lie one element beyond it.
#include <emmintrin.h>
#include <stdint.h>

#include "core/status.h"
#include "segment/segment_bounds.h"

namespace zelcv {
namespace bounds {
namespace {

template <typename T>
__m128i cmpeq(__m128i a, __m128i b);
template <>
__m128i cmpeq<uint8_t>(__m128i a, __m128i b) {
  return _mm_cmpeq_epi8(a, b);
}
template <>
__m128i cmpeq<uint16_t>(__m128i a, __m128i b) {
  return _mm_cmpeq_epi16(a, b);
}
template <>
__m128i cmpeq<int32_t>(__m128i a, __m128i b) {
  return _mm_cmpeq_epi32(a, b);
}

template <typename T>
__m128i splat(T v) {
  if (sizeof(T) == 1) return _mm_set1_epi8(static_cast<char>(v));
  if (sizeof(T) == 2) return _mm_set1_epi16(static_cast<short>(v));
  return _mm_set1_epi32(static_cast<int>(v));
}

template <typename T>
__m128i load(const T* p) {
  return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p));
}

}  // namespace

template <typename T, bool kVector>
void markRow(T* row, const T* below, int w, T val, bool conn8) {
  constexpr int kLanes = 16 / int(sizeof(T));
  auto changes = [&](int x) {
    const T v = row[x];
    if (x + 1 < w && row[x + 1] != v) return true;
    if (!below) return false;
    if (below[x] != v) return true;
    if (conn8 && ((x > 0 && below[x - 1] != v) || (x + 1 < w && below[x + 1] != v))) return true;
    return false;
  };
  int x = 0;
  if (kVector && w > kLanes) {
    // Column 0 first (no lower-left neighbour), then blocks while the right
    // neighbours exist: columns 1 .. w - 2.
    const bool first = changes(0);
    const __m128i vv = splat(val);
    for (x = 1; x + kLanes + 1 <= w; x += kLanes) {
      const __m128i c = load(row + x);
      __m128i same = cmpeq<T>(c, load(row + x + 1));
      if (below) {
        same = _mm_and_si128(same, cmpeq<T>(c, load(below + x)));
        if (conn8)
          same = _mm_and_si128(same, _mm_and_si128(cmpeq<T>(c, load(below + x - 1)),
                                                   cmpeq<T>(c, load(below + x + 1))));
      }
      // Keep equal lanes, put val where anything differs.
      _mm_storeu_si128(reinterpret_cast<__m128i*>(row + x),
                       _mm_or_si128(_mm_and_si128(same, c), _mm_andnot_si128(same, vv)));
    }
    if (first) row[0] = val;
  }
  for (; x < w; ++x)
    if (changes(x)) row[x] = val;
}

template void markRow<uint8_t, false>(uint8_t*, const uint8_t*, int, uint8_t, bool);
template void markRow<uint8_t, true>(uint8_t*, const uint8_t*, int, uint8_t, bool);
template void markRow<uint16_t, false>(uint16_t*, const uint16_t*, int, uint16_t, bool);
template void markRow<uint16_t, true>(uint16_t*, const uint16_t*, int, uint16_t, bool);
template void markRow<int32_t, false>(int32_t*, const int32_t*, int, int32_t, bool);
template void markRow<int32_t, true>(int32_t*, const int32_t*, int, int32_t, bool);

}  // namespace bounds

namespace {

template <typename T>
ZelStatus bound(T* markers, int step, ZeliSize roi, T val, int norm) {
  if (ZelStatus s = checkImages({image(markers, step)}, roi)) return s;
  if (norm != zelNormInf && norm != zelNormL1) return zelStatusBadArgument;
  for (int y = 0; y < roi.height; ++y) {
    T* row = reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(markers) + int64_t(step) * y);
    const T* below = y + 1 < roi.height ? reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(row) + step)
                                        : nullptr;
    bounds::markRow<T, true>(row, below, roi.width, val, norm == zelNormInf);
  }
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliBoundSegments_8u_C1IR)(Zel8u* markers, int markersStep, ZeliSize roiSize, Zel8u val, int norm) {
  return bound(markers, markersStep, roiSize, val, norm);
}

ZELCV_ENTRY(zeliBoundSegments_16u_C1IR)(Zel16u* markers, int markersStep, ZeliSize roiSize, Zel16u val,
                                        int norm) {
  return bound(markers, markersStep, roiSize, val, norm);
}

ZELCV_ENTRY(zeliBoundSegments_32s_C1IR)(Zel32s* markers, int markersStep, ZeliSize roiSize, Zel32s val,
                                        int norm) {
  return bound(markers, markersStep, roiSize, val, norm);
}
