// The SSE2 rows of the reductions for one-channel 8u and 32f data. Included
// by reduce.h after the generic VectorRow; each row returns how many columns
// it handled, from column 0, and the scalar row takes the rest.
#ifndef ZELCV_STATS_REDUCE_SSE2_H
#define ZELCV_STATS_REDUCE_SSE2_H

#include <emmintrin.h>

namespace zelcv {
namespace stats {

inline uint64_t sum64(__m128i v) {
  alignas(16) uint64_t s[2];
  _mm_store_si128(reinterpret_cast<__m128i*>(s), v);
  return s[0] + s[1];
}

inline uint8_t maxByte(__m128i v) {
  v = _mm_max_epu8(v, _mm_srli_si128(v, 8));
  v = _mm_max_epu8(v, _mm_srli_si128(v, 4));
  v = _mm_max_epu8(v, _mm_srli_si128(v, 2));
  v = _mm_max_epu8(v, _mm_srli_si128(v, 1));
  return uint8_t(_mm_cvtsi128_si32(v));
}

inline uint8_t minByte(__m128i v) {
  v = _mm_min_epu8(v, _mm_srli_si128(v, 8));
  v = _mm_min_epu8(v, _mm_srli_si128(v, 4));
  v = _mm_min_epu8(v, _mm_srli_si128(v, 2));
  v = _mm_min_epu8(v, _mm_srli_si128(v, 1));
  return uint8_t(_mm_cvtsi128_si32(v));
}

// 8u: |a - b| by saturating differences; the mask clears unselected bytes.
// Squares are summed in 32-bit lanes for at most kChunk vectors (each lane
// gains at most 4 x 255^2 per vector), then widened.
template <Kind K, bool kTwo, bool kMask>
struct VectorRow<K, kTwo, kMask, uint8_t> {
  static constexpr int kChunk = 4096;
  static constexpr bool kSums = K == Kind::L1 || K == Kind::Sum || K == Kind::SumSq;
  static constexpr bool kSquares = K == Kind::L2 || K == Kind::SumSq;
  static constexpr bool kCount = kMask && (K == Kind::Sum || K == Kind::SumSq);

  static __m128i squares(__m128i v) {
    const __m128i zero = _mm_setzero_si128();
    const __m128i lo = _mm_unpacklo_epi8(v, zero), hi = _mm_unpackhi_epi8(v, zero);
    return _mm_add_epi32(_mm_madd_epi16(lo, lo), _mm_madd_epi16(hi, hi));
  }

  static int run(Acc<uint8_t>& acc, const uint8_t* a, const uint8_t* b, const uint8_t* m, int w) {
    const __m128i zero = _mm_setzero_si128(), ones = _mm_set1_epi8(1);
    const int end = w & ~15;
    __m128i vmax = zero, s64 = zero, q64 = zero, n64 = zero;
    for (int x = 0; x < end;) {
      const int chunkEnd = end - x > kChunk * 16 ? x + kChunk * 16 : end;
      __m128i q32 = zero;
      for (; x < chunkEnd; x += 16) {
        __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(a + x));
        if (kTwo) {
          const __m128i vb = _mm_loadu_si128(reinterpret_cast<const __m128i*>(b + x));
          v = _mm_or_si128(_mm_subs_epu8(v, vb), _mm_subs_epu8(vb, v));
        }
        if (kMask) {
          const __m128i off = _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(m + x)), zero);
          v = _mm_andnot_si128(off, v);
          if (kCount) n64 = _mm_add_epi64(n64, _mm_sad_epu8(_mm_andnot_si128(off, ones), zero));
        }
        if (K == Kind::Inf) vmax = _mm_max_epu8(vmax, v);
        if (kSums) s64 = _mm_add_epi64(s64, _mm_sad_epu8(v, zero));
        if (kSquares) q32 = _mm_add_epi32(q32, squares(v));
      }
      if (kSquares)
        q64 = _mm_add_epi64(q64, _mm_add_epi64(_mm_unpacklo_epi32(q32, zero), _mm_unpackhi_epi32(q32, zero)));
    }
    if (K == Kind::Inf) {
      const uint32_t v = maxByte(vmax);
      if (v > acc.maxAbs) acc.maxAbs = v;
    }
    if (K == Kind::L1) acc.sumAbs += sum64(s64);
    if (K == Kind::Sum || K == Kind::SumSq) acc.sum += int64_t(sum64(s64));
    if (kSquares) acc.sumSq += sum64(q64);
    if (kCount) acc.count += sum64(n64);
    return end;
  }
};

// 32f: eight columns per step, lanes (0, 1), (2, 3), (4, 5), (6, 7) in four
// double vectors; the mask clears unselected values to +0.
template <Kind K, bool kTwo, bool kMask>
struct VectorRow<K, kTwo, kMask, float> {
  static constexpr bool kSums = K == Kind::L1 || K == Kind::Sum || K == Kind::SumSq;
  static constexpr bool kSquares = K == Kind::L2 || K == Kind::SumSq;
  static constexpr bool kCount = kMask && (K == Kind::Sum || K == Kind::SumSq);

  static __m128 absolute(__m128 v) { return _mm_andnot_ps(_mm_set1_ps(-0.0f), v); }

  static int run(Acc<float>& acc, const float* a, const float* b, const uint8_t* m, int w) {
    const int end = w & ~7;
    if (end == 0) return 0;
    const __m128i zero = _mm_setzero_si128(), ones = _mm_set1_epi8(1);
    __m128d s[4], q[4];
    for (int i = 0; i < 4; ++i) {
      s[i] = _mm_loadu_pd(acc.lane + 2 * i);
      q[i] = _mm_loadu_pd(acc.sq + 2 * i);
    }
    __m128 vmax = _mm_set1_ps(acc.maxAbs);
    __m128i n64 = zero;
    for (int x = 0; x < end; x += 8) {
      __m128 v0 = _mm_loadu_ps(a + x), v1 = _mm_loadu_ps(a + x + 4);
      if (kTwo) {
        v0 = _mm_sub_ps(v0, _mm_loadu_ps(b + x));
        v1 = _mm_sub_ps(v1, _mm_loadu_ps(b + x + 4));
      }
      if (kMask) {
        const __m128i off8 = _mm_cmpeq_epi8(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(m + x)), zero);
        const __m128i off16 = _mm_unpacklo_epi8(off8, off8);
        v0 = _mm_andnot_ps(_mm_castsi128_ps(_mm_unpacklo_epi16(off16, off16)), v0);
        v1 = _mm_andnot_ps(_mm_castsi128_ps(_mm_unpackhi_epi16(off16, off16)), v1);
        // The upper eight bytes compare equal to zero and count nothing.
        if (kCount) n64 = _mm_add_epi64(n64, _mm_sad_epu8(_mm_andnot_si128(off8, ones), zero));
      }
      if (K == Kind::Inf) {
        // A NaN leaves the running maximum as it is, as in the scalar row.
        vmax = _mm_max_ps(absolute(v0), vmax);
        vmax = _mm_max_ps(absolute(v1), vmax);
        continue;
      }
      if (K == Kind::L1) {
        v0 = absolute(v0);
        v1 = absolute(v1);
      }
      const __m128d d[4] = {_mm_cvtps_pd(v0), _mm_cvtps_pd(_mm_movehl_ps(v0, v0)), _mm_cvtps_pd(v1),
                            _mm_cvtps_pd(_mm_movehl_ps(v1, v1))};
      for (int i = 0; i < 4; ++i) {
        if (kSums) s[i] = _mm_add_pd(s[i], d[i]);
        if (kSquares) q[i] = _mm_add_pd(q[i], _mm_mul_pd(d[i], d[i]));
      }
    }
    for (int i = 0; i < 4; ++i) {
      _mm_storeu_pd(acc.lane + 2 * i, s[i]);
      _mm_storeu_pd(acc.sq + 2 * i, q[i]);
    }
    if (K == Kind::Inf) {
      alignas(16) float lanes[4];
      _mm_store_ps(lanes, vmax);
      for (float v : lanes)
        if (v > acc.maxAbs) acc.maxAbs = v;
    }
    if (kCount) acc.count += sum64(n64);
    return end;
  }
};

}  // namespace stats
}  // namespace zelcv

#endif  // ZELCV_STATS_REDUCE_SSE2_H
