// The AVX2 rows of the reductions for one-channel 8u and 32f data: the same
// sums as the SSE2 rows (exact integers; the same sixteen double lanes for
// 32f, four per vector), twice as many bytes per instruction.
#include <immintrin.h>

#include "kernels/simd_avx2.h"
#include "stats/reduce.h"

namespace zelcv {
namespace avx2 {
namespace {

// Through memory: 32-bit x86 has no 64-bit moves out of vectors.
inline uint64_t statSum64(__m128i s) {
  alignas(16) uint64_t l[2];
  _mm_store_si128(reinterpret_cast<__m128i*>(l), s);
  return l[0] + l[1];
}
inline uint64_t statSum64(__m256i v) {
  return statSum64(_mm_add_epi64(_mm256_castsi256_si128(v), _mm256_extracti128_si256(v, 1)));
}

inline uint32_t statMaxByte(__m256i v) {
  __m128i m = _mm_max_epu8(_mm256_castsi256_si128(v), _mm256_extracti128_si256(v, 1));
  m = _mm_max_epu8(m, _mm_srli_si128(m, 8));
  m = _mm_max_epu8(m, _mm_srli_si128(m, 4));
  m = _mm_max_epu8(m, _mm_srli_si128(m, 2));
  m = _mm_max_epu8(m, _mm_srli_si128(m, 1));
  return uint32_t(_mm_cvtsi128_si32(m) & 0xFF);
}

}  // namespace
}  // namespace avx2

namespace stats {

template <Kind K, bool kTwo, bool kMask>
int VectorRow<K, kTwo, kMask, uint8_t, avx2::Isa>::run(Acc<uint8_t>& acc, const uint8_t* a, const uint8_t* b,
                                                       const uint8_t* m, int w) {
  constexpr bool kSums = K == Kind::L1 || K == Kind::Sum || K == Kind::SumSq;
  constexpr bool kSquares = K == Kind::L2 || K == Kind::SumSq;
  constexpr bool kCount = kMask && (K == Kind::Sum || K == Kind::SumSq);
  constexpr int kChunk = 4096;  // vectors per widening of the square sums: below 2^31
  const __m256i zero = _mm256_setzero_si256();
  auto value = [&](int x, __m256i& n64) {
    __m256i v = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(a + x));
    if (kTwo) {
      const __m256i vb = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(b + x));
      v = _mm256_or_si256(_mm256_subs_epu8(v, vb), _mm256_subs_epu8(vb, v));
    }
    if (kMask) {
      const __m256i off = _mm256_cmpeq_epi8(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(m + x)), zero);
      v = _mm256_andnot_si256(off, v);
      if (kCount)
        n64 = _mm256_add_epi64(n64, _mm256_sad_epu8(_mm256_andnot_si256(off, _mm256_set1_epi8(1)), zero));
    }
    return v;
  };
  const int end = w & ~31;
  __m256i vmax[2] = {zero, zero}, s64[2] = {zero, zero}, q64 = zero, n64 = zero;
  for (int x = 0; x < end;) {
    const int chunkEnd = end - x > kChunk * 32 ? x + kChunk * 32 : end;
    __m256i q32[2] = {zero, zero};
    auto add = [&](int i, __m256i v) {
      if (K == Kind::Inf) vmax[i] = _mm256_max_epu8(vmax[i], v);
      if (kSums) s64[i] = _mm256_add_epi64(s64[i], _mm256_sad_epu8(v, zero));
      if (kSquares) {
        const __m256i lo = _mm256_unpacklo_epi8(v, zero), hi = _mm256_unpackhi_epi8(v, zero);
        q32[i] = _mm256_add_epi32(q32[i], _mm256_add_epi32(_mm256_madd_epi16(lo, lo), _mm256_madd_epi16(hi, hi)));
      }
    };
    for (; x + 64 <= chunkEnd; x += 64) {
      const __m256i v0 = value(x, n64), v1 = value(x + 32, n64);
      add(0, v0);
      add(1, v1);
    }
    if (x < chunkEnd) {
      add(0, value(x, n64));
      x += 32;
    }
    if (kSquares) {
      const __m256i q = _mm256_add_epi32(q32[0], q32[1]);
      q64 = _mm256_add_epi64(q64, _mm256_add_epi64(_mm256_unpacklo_epi32(q, zero), _mm256_unpackhi_epi32(q, zero)));
    }
  }
  if (K == Kind::Inf) {
    const uint32_t v = avx2::statMaxByte(_mm256_max_epu8(vmax[0], vmax[1]));
    if (v > acc.maxAbs) acc.maxAbs = v;
  }
  const uint64_t sums = avx2::statSum64(_mm256_add_epi64(s64[0], s64[1]));
  if (K == Kind::L1) acc.sumAbs += sums;
  if (K == Kind::Sum || K == Kind::SumSq) acc.sum += int64_t(sums);
  if (kSquares) acc.sumSq += avx2::statSum64(q64);
  if (kCount) acc.count += avx2::statSum64(n64);
  return end;
}

// Lanes (0..3), (4..7), (8..11), (12..15) in four double vectors.
template <Kind K, bool kTwo, bool kMask>
int VectorRow<K, kTwo, kMask, float, avx2::Isa>::run(Acc<float>& acc, const float* a, const float* b,
                                                     const uint8_t* m, int w) {
  constexpr bool kSums = K == Kind::L1 || K == Kind::Sum || K == Kind::SumSq;
  constexpr bool kSquares = K == Kind::L2 || K == Kind::SumSq;
  constexpr bool kCount = kMask && (K == Kind::Sum || K == Kind::SumSq);
  const int end = w & ~15;
  if (end == 0) return 0;
  const __m128i zero = _mm_setzero_si128();
  const __m128 sign = _mm_set1_ps(-0.0f);
  __m256d s[4], q[4];
  for (int i = 0; i < 4; ++i) {
    s[i] = _mm256_loadu_pd(acc.lane + 4 * i);
    q[i] = _mm256_loadu_pd(acc.sq + 4 * i);
  }
  __m128 vmax = _mm_set1_ps(acc.maxAbs);
  __m128i n64 = zero;
  for (int x = 0; x < end; x += 16) {
    __m128i off8 = zero;
    if (kMask) {
      off8 = _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i*>(m + x)), zero);
      if (kCount) n64 = _mm_add_epi64(n64, _mm_sad_epu8(_mm_andnot_si128(off8, _mm_set1_epi8(1)), zero));
    }
    for (int g = 0; g < 4; ++g) {
      __m128 v = _mm_loadu_ps(a + x + 4 * g);
      if (kTwo) v = _mm_sub_ps(v, _mm_loadu_ps(b + x + 4 * g));
      if (kMask) {
        __m128i bytes = off8;
        if (g == 1) bytes = _mm_srli_si128(off8, 4);
        if (g == 2) bytes = _mm_srli_si128(off8, 8);
        if (g == 3) bytes = _mm_srli_si128(off8, 12);
        v = _mm_andnot_ps(_mm_castsi128_ps(_mm_cvtepi8_epi32(bytes)), v);
      }
      if (K == Kind::Inf) {
        vmax = _mm_max_ps(_mm_andnot_ps(sign, v), vmax);
        continue;
      }
      if (K == Kind::L1) v = _mm_andnot_ps(sign, v);
      const __m256d d = _mm256_cvtps_pd(v);
      if (kSums) s[g] = _mm256_add_pd(s[g], d);
      if (kSquares) q[g] = _mm256_add_pd(q[g], _mm256_mul_pd(d, d));
    }
  }
  for (int i = 0; i < 4; ++i) {
    _mm256_storeu_pd(acc.lane + 4 * i, s[i]);
    _mm256_storeu_pd(acc.sq + 4 * i, q[i]);
  }
  if (K == Kind::Inf) {
    alignas(16) float lanes[4];
    _mm_store_ps(lanes, vmax);
    for (int i = 0; i < 4; ++i)
      if (lanes[i] > acc.maxAbs) acc.maxAbs = lanes[i];
  }
  if (kCount) {
    acc.count += avx2::statSum64(n64);
  }
  return end;
}

#define ZELCV_STATS_AVX2_ROWS(T)                                \
  template struct VectorRow<Kind::Inf, false, false, T, avx2::Isa>;   \
  template struct VectorRow<Kind::Inf, false, true, T, avx2::Isa>;    \
  template struct VectorRow<Kind::Inf, true, false, T, avx2::Isa>;    \
  template struct VectorRow<Kind::Inf, true, true, T, avx2::Isa>;     \
  template struct VectorRow<Kind::L1, false, false, T, avx2::Isa>;    \
  template struct VectorRow<Kind::L1, false, true, T, avx2::Isa>;     \
  template struct VectorRow<Kind::L1, true, false, T, avx2::Isa>;     \
  template struct VectorRow<Kind::L1, true, true, T, avx2::Isa>;      \
  template struct VectorRow<Kind::L2, false, false, T, avx2::Isa>;    \
  template struct VectorRow<Kind::L2, false, true, T, avx2::Isa>;     \
  template struct VectorRow<Kind::L2, true, false, T, avx2::Isa>;     \
  template struct VectorRow<Kind::L2, true, true, T, avx2::Isa>;      \
  template struct VectorRow<Kind::Sum, false, false, T, avx2::Isa>;   \
  template struct VectorRow<Kind::Sum, false, true, T, avx2::Isa>;    \
  template struct VectorRow<Kind::SumSq, false, false, T, avx2::Isa>; \
  template struct VectorRow<Kind::SumSq, false, true, T, avx2::Isa>;

ZELCV_STATS_AVX2_ROWS(uint8_t)
ZELCV_STATS_AVX2_ROWS(float)

}  // namespace stats
}  // namespace zelcv
