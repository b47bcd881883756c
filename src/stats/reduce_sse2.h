// The SSE2 rows of the reductions for one-channel 8u and 32f data, and the
// declarations of the AVX2 ones. Included
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
struct VectorRow<K, kTwo, kMask, uint8_t, simd::Sse2> {
  static constexpr int kChunk = 4096;
  static constexpr bool kSums = K == Kind::L1 || K == Kind::Sum || K == Kind::SumSq;
  static constexpr bool kSquares = K == Kind::L2 || K == Kind::SumSq;
  static constexpr bool kCount = kMask && (K == Kind::Sum || K == Kind::SumSq);

  static __m128i squares(__m128i v) {
    const __m128i zero = _mm_setzero_si128();
    const __m128i lo = _mm_unpacklo_epi8(v, zero), hi = _mm_unpackhi_epi8(v, zero);
    return _mm_add_epi32(_mm_madd_epi16(lo, lo), _mm_madd_epi16(hi, hi));
  }

  // The value vector at column x: |a| or |a - b|, unselected bytes cleared;
  // counts the selected bytes on the way.
  static __m128i value(const uint8_t* a, const uint8_t* b, const uint8_t* m, int x, __m128i& n64) {
    const __m128i zero = _mm_setzero_si128();
    __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(a + x));
    if (kTwo) {
      const __m128i vb = _mm_loadu_si128(reinterpret_cast<const __m128i*>(b + x));
      v = _mm_or_si128(_mm_subs_epu8(v, vb), _mm_subs_epu8(vb, v));
    }
    if (kMask) {
      const __m128i off = _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(m + x)), zero);
      v = _mm_andnot_si128(off, v);
      if (kCount) n64 = _mm_add_epi64(n64, _mm_sad_epu8(_mm_andnot_si128(off, _mm_set1_epi8(1)), zero));
    }
    return v;
  }

  // Two vectors per step into separate sums, so that the additions overlap.
  static int run(Acc<uint8_t>& acc, const uint8_t* a, const uint8_t* b, const uint8_t* m, int w) {
    const __m128i zero = _mm_setzero_si128();
    const int end = w & ~15;
    __m128i vmax[2] = {zero, zero}, s64[2] = {zero, zero}, q64 = zero, n64 = zero;
    for (int x = 0; x < end;) {
      const int chunkEnd = end - x > kChunk * 16 ? x + kChunk * 16 : end;
      __m128i q32[2] = {zero, zero};
      auto add = [&](int i, __m128i v) {
        if (K == Kind::Inf) vmax[i] = _mm_max_epu8(vmax[i], v);
        if (kSums) s64[i] = _mm_add_epi64(s64[i], _mm_sad_epu8(v, zero));
        if (kSquares) q32[i] = _mm_add_epi32(q32[i], squares(v));
      };
      for (; x + 32 <= chunkEnd; x += 32) {
        const __m128i v0 = value(a, b, m, x, n64), v1 = value(a, b, m, x + 16, n64);
        add(0, v0);
        add(1, v1);
      }
      if (x < chunkEnd) {
        add(0, value(a, b, m, x, n64));
        x += 16;
      }
      if (kSquares) {
        const __m128i q = _mm_add_epi32(q32[0], q32[1]);  // kChunk vectors in all: below 2^31
        q64 = _mm_add_epi64(q64, _mm_add_epi64(_mm_unpacklo_epi32(q, zero), _mm_unpackhi_epi32(q, zero)));
      }
    }
    if (K == Kind::Inf) {
      const uint32_t v = maxByte(_mm_max_epu8(vmax[0], vmax[1]));
      if (v > acc.maxAbs) acc.maxAbs = v;
    }
    const uint64_t sums = sum64(_mm_add_epi64(s64[0], s64[1]));
    if (K == Kind::L1) acc.sumAbs += sums;
    if (K == Kind::Sum || K == Kind::SumSq) acc.sum += int64_t(sums);
    if (kSquares) acc.sumSq += sum64(q64);
    if (kCount) acc.count += sum64(n64);
    return end;
  }
};

// 32f: sixteen columns per step, lanes (0, 1), (2, 3), ..., (14, 15) in
// eight double vectors; the mask clears unselected values to +0.
template <Kind K, bool kTwo, bool kMask>
struct VectorRow<K, kTwo, kMask, float, simd::Sse2> {
  static constexpr bool kSums = K == Kind::L1 || K == Kind::Sum || K == Kind::SumSq;
  static constexpr bool kSquares = K == Kind::L2 || K == Kind::SumSq;
  static constexpr bool kCount = kMask && (K == Kind::Sum || K == Kind::SumSq);

  static __m128 absolute(__m128 v) { return _mm_andnot_ps(_mm_set1_ps(-0.0f), v); }

  static int run(Acc<float>& acc, const float* a, const float* b, const uint8_t* m, int w) {
    const int end = w & ~15;
    if (end == 0) return 0;
    const __m128i zero = _mm_setzero_si128(), ones = _mm_set1_epi8(1);
    __m128d s[8], q[8];
    for (int i = 0; i < 8; ++i) {
      s[i] = _mm_loadu_pd(acc.lane + 2 * i);
      q[i] = _mm_loadu_pd(acc.sq + 2 * i);
    }
    __m128 vmax = _mm_set1_ps(acc.maxAbs);
    __m128i n64 = zero;
    for (int x = 0; x < end; x += 16) {
      __m128 v[4];
      __m128i off8 = zero;
      if (kMask) {
        off8 = _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(m + x)), zero);
        if (kCount) n64 = _mm_add_epi64(n64, _mm_sad_epu8(_mm_andnot_si128(off8, ones), zero));
      }
      const __m128i off16[2] = {_mm_unpacklo_epi8(off8, off8), _mm_unpackhi_epi8(off8, off8)};
      for (int g = 0; g < 4; ++g) {
        v[g] = _mm_loadu_ps(a + x + 4 * g);
        if (kTwo) v[g] = _mm_sub_ps(v[g], _mm_loadu_ps(b + x + 4 * g));
        if (kMask) {
          const __m128i o = g % 2 ? _mm_unpackhi_epi16(off16[g / 2], off16[g / 2])
                                  : _mm_unpacklo_epi16(off16[g / 2], off16[g / 2]);
          v[g] = _mm_andnot_ps(_mm_castsi128_ps(o), v[g]);
        }
        // A NaN leaves the running maximum as it is, as in the scalar row.
        if (K == Kind::Inf) vmax = _mm_max_ps(absolute(v[g]), vmax);
        if (K == Kind::L1) v[g] = absolute(v[g]);
      }
      if (K == Kind::Inf) continue;
      for (int g = 0; g < 4; ++g) {
        const __m128d d[2] = {_mm_cvtps_pd(v[g]), _mm_cvtps_pd(_mm_movehl_ps(v[g], v[g]))};
        for (int i = 0; i < 2; ++i) {
          if (kSums) s[2 * g + i] = _mm_add_pd(s[2 * g + i], d[i]);
          if (kSquares) q[2 * g + i] = _mm_add_pd(q[2 * g + i], _mm_mul_pd(d[i], d[i]));
        }
      }
    }
    for (int i = 0; i < 8; ++i) {
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

// The AVX2 rows, defined in reduce_avx2.cpp for every kind and flag.
template <Kind K, bool kTwo, bool kMask>
struct VectorRow<K, kTwo, kMask, uint8_t, avx2::Isa> {
  static int run(Acc<uint8_t>& acc, const uint8_t* a, const uint8_t* b, const uint8_t* m, int w);
};
template <Kind K, bool kTwo, bool kMask>
struct VectorRow<K, kTwo, kMask, float, avx2::Isa> {
  static int run(Acc<float>& acc, const float* a, const float* b, const uint8_t* m, int w);
};

}  // namespace stats
}  // namespace zelcv

#endif  // ZELCV_STATS_REDUCE_SSE2_H
