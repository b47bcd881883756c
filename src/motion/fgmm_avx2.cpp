// The mixture model's AVX2 kernel: eight pixels per pass, the two groups of
// four side by side in the halves of each vector. Every operation is the
// baseline's (no fused multiply-add), so every lane gives the same bits.
#include <immintrin.h>
#include <stdint.h>
#include <string.h>

#include "kernels/simd_avx2.h"
#include "motion/fgmm_kernels.h"

namespace zelcv {
namespace avx2 {

namespace {

using background::FrameScalars;
using background::kFields;

struct Consts {
  __m256 a, b, c, tb, tg, ratio, varInit, varMin, varMax, one, zero;
};

inline __m256 load2(const float* p0, const float* p1) {
  return _mm256_insertf128_ps(_mm256_castps128_ps256(_mm_load_ps(p0)), _mm_load_ps(p1), 1);
}
inline void store2(float* p0, float* p1, __m256 v) {
  _mm_store_ps(p0, _mm256_castps256_ps128(v));
  _mm_store_ps(p1, _mm256_extractf128_ps(v, 1));
}
// Masks are whole lanes of ones or zeros: the same as and/andnot/or.
inline __m256 blend(__m256 mask, __m256 yes, __m256 no) { return _mm256_blendv_ps(no, yes, mask); }
inline __m256 gt(__m256 a, __m256 b) { return _mm256_cmp_ps(a, b, _CMP_GT_OQ); }
inline __m256 lt(__m256 a, __m256 b) { return _mm256_cmp_ps(a, b, _CMP_LT_OQ); }
inline __m256 ge(__m256 a, __m256 b) { return _mm256_cmp_ps(a, b, _CMP_GE_OQ); }
inline __m256 eq(__m256 a, __m256 b) { return _mm256_cmp_ps(a, b, _CMP_EQ_OQ); }

// Eight interleaved 8u C3 pixels (24 bytes) as three planar float vectors.
inline void loadPixels(const uint8_t* s, __m256* x) {
  const __m128i lo = _mm_loadu_si128(reinterpret_cast<const __m128i*>(s));
  const __m128i hi = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(s + 16));
  const __m128i c0 = _mm_or_si128(_mm_shuffle_epi8(lo, _mm_setr_epi8(0, 3, 6, 9, 12, 15, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1)),
                                  _mm_shuffle_epi8(hi, _mm_setr_epi8(-1, -1, -1, -1, -1, -1, 2, 5, -1, -1, -1, -1, -1, -1, -1, -1)));
  const __m128i c1 = _mm_or_si128(_mm_shuffle_epi8(lo, _mm_setr_epi8(1, 4, 7, 10, 13, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1)),
                                  _mm_shuffle_epi8(hi, _mm_setr_epi8(-1, -1, -1, -1, -1, 0, 3, 6, -1, -1, -1, -1, -1, -1, -1, -1)));
  const __m128i c2 = _mm_or_si128(_mm_shuffle_epi8(lo, _mm_setr_epi8(2, 5, 8, 11, 14, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1)),
                                  _mm_shuffle_epi8(hi, _mm_setr_epi8(-1, -1, -1, -1, -1, 1, 4, 7, -1, -1, -1, -1, -1, -1, -1, -1)));
  x[0] = _mm256_cvtepi32_ps(_mm256_cvtepu8_epi32(c0));
  x[1] = _mm256_cvtepi32_ps(_mm256_cvtepu8_epi32(c1));
  x[2] = _mm256_cvtepi32_ps(_mm256_cvtepu8_epi32(c2));
}

// Two groups of four pixels, g0 and g1: returns the foreground lanes as
// all-ones. Mirrors the baseline's processGroup step for step, except that
// a component unused (weight 0) in all eight lanes is not evaluated: it is
// never close and never matched, its new weight is 0 (0 * b - c is not
// above 0) and adds nothing to a rank sum, so only replacement can change
// it.
template <int K>
inline __m256 processPair(float* g0, float* g1, const __m256* x, const Consts& f) {
  // Read only for live components; zeroed because some optimisation levels
  // cannot see that and warn.
  __m256 w[K], e[K][3] = {}, dist[K] = {}, v[K] = {};
  bool live[K];
  for (int k = 0; k < K; ++k) {
    const int o = k * kFields * 4;
    w[k] = load2(g0 + o, g1 + o);
    live[k] = _mm256_movemask_ps(gt(w[k], f.zero)) != 0;
    if (!live[k]) continue;
    for (int j = 0; j < 3; ++j) e[k][j] = _mm256_sub_ps(x[j], load2(g0 + o + 4 * (1 + j), g1 + o + 4 * (1 + j)));
    dist[k] = _mm256_add_ps(_mm256_add_ps(_mm256_mul_ps(e[k][0], e[k][0]), _mm256_mul_ps(e[k][1], e[k][1])),
                            _mm256_mul_ps(e[k][2], e[k][2]));
    v[k] = load2(g0 + o + 16, g1 + o + 16);
  }
  __m256 background = f.zero, bestW = _mm256_set1_ps(-1.0f), bestIdx = _mm256_set1_ps(-1.0f);
  for (int k = 0; k < K; ++k) {
    if (!live[k]) continue;
    const __m256 used = gt(w[k], f.zero);
    const __m256 close = _mm256_and_ps(used, lt(dist[k], _mm256_mul_ps(f.tb, v[k])));
    if (_mm256_movemask_ps(close)) {
      __m256 ranked = f.zero;
      for (int j = 0; j < K; ++j) {
        if (j == k || !live[j]) continue;
        const __m256 before = j < k ? ge(w[j], w[k]) : gt(w[j], w[k]);
        ranked = _mm256_add_ps(ranked, _mm256_and_ps(before, w[j]));
      }
      background = _mm256_or_ps(background, _mm256_and_ps(close, lt(ranked, f.ratio)));
    }
    const __m256 take = _mm256_and_ps(_mm256_and_ps(used, lt(dist[k], _mm256_mul_ps(f.tg, v[k]))), gt(w[k], bestW));
    bestW = blend(take, w[k], bestW);
    bestIdx = blend(take, _mm256_set1_ps(float(k)), bestIdx);
  }
  __m256 nw[K], matched[K], matchedW = f.zero;
  for (int k = 0; k < K; ++k) {
    if (!live[k]) {
      nw[k] = matched[k] = f.zero;
      continue;
    }
    matched[k] = eq(bestIdx, _mm256_set1_ps(float(k)));
    const __m256 t = _mm256_add_ps(_mm256_sub_ps(_mm256_mul_ps(w[k], f.b), f.c), _mm256_and_ps(matched[k], f.a));
    nw[k] = _mm256_and_ps(gt(t, f.zero), t);
    matchedW = _mm256_add_ps(matchedW, _mm256_and_ps(matched[k], nw[k]));
  }
  const __m256 noMatch = lt(bestIdx, f.zero);
  __m256 minW = nw[0], minIdx = f.zero;
  for (int k = 1; k < K; ++k) {
    const __m256 lighter = lt(nw[k], minW);
    minW = blend(lighter, nw[k], minW);
    minIdx = blend(lighter, _mm256_set1_ps(float(k)), minIdx);
  }
  const __m256 r = _mm256_min_ps(_mm256_div_ps(f.a, blend(noMatch, f.one, matchedW)), f.one);
  bool keep[K];  // weight 0 before and after in every lane
  for (int k = 0; k < K; ++k) {
    const int o = k * kFields * 4;
    const __m256 replace = _mm256_and_ps(noMatch, eq(minIdx, _mm256_set1_ps(float(k))));
    nw[k] = blend(replace, f.a, nw[k]);
    const int replaced = _mm256_movemask_ps(replace);
    keep[k] = !live[k] && !replaced;
    // Means and variance change only where the component is matched or
    // replaced; a pair of groups with neither keeps them as they are.
    if (!live[k]) {
      if (!replaced) continue;
      for (int j = 0; j < 3; ++j) {
        float* p0 = g0 + o + 4 * (1 + j);
        float* p1 = g1 + o + 4 * (1 + j);
        store2(p0, p1, blend(replace, x[j], load2(p0, p1)));
      }
      store2(g0 + o + 16, g1 + o + 16, blend(replace, f.varInit, load2(g0 + o + 16, g1 + o + 16)));
    } else if (replaced | _mm256_movemask_ps(matched[k])) {
      for (int j = 0; j < 3; ++j) {
        float* p0 = g0 + o + 4 * (1 + j);
        float* p1 = g1 + o + 4 * (1 + j);
        const __m256 u = load2(p0, p1);
        const __m256 moved = blend(matched[k], _mm256_add_ps(u, _mm256_mul_ps(r, e[k][j])), u);
        store2(p0, p1, blend(replace, x[j], moved));
      }
      const __m256 nv = _mm256_min_ps(
          _mm256_max_ps(_mm256_add_ps(v[k], _mm256_mul_ps(r, _mm256_sub_ps(dist[k], v[k]))), f.varMin), f.varMax);
      store2(g0 + o + 16, g1 + o + 16, blend(replace, f.varInit, blend(matched[k], nv, v[k])));
    }
  }
  __m256 sum = nw[0];
  for (int k = 1; k < K; ++k) sum = _mm256_add_ps(sum, nw[k]);
  for (int k = 0; k < K; ++k) {
    if (keep[k]) continue;  // 0 / sum is the 0 already stored
    const int o = k * kFields * 4;
    store2(g0 + o, g1 + o, _mm256_div_ps(nw[k], sum));
  }
  return _mm256_andnot_ps(background, _mm256_castsi256_ps(_mm256_set1_epi32(-1)));
}

template <int K>
int runRow(const uint8_t* s, uint8_t* d, float* g, int width, const Consts& f) {
  constexpr int kGroup = K * kFields * 4;
  int x = 0;
  for (; x + 8 <= width; x += 8, g += 2 * kGroup) {
    // The state streams through memory (20 bytes per component and pixel):
    // ask for the groups four passes ahead. A prefetch beyond the state is
    // harmless; the address is formed as an integer.
    const uintptr_t ahead = reinterpret_cast<uintptr_t>(g) + 8 * kGroup * sizeof(float);
    for (int line = 0; line < 2 * kGroup * 4; line += 64)
      _mm_prefetch(reinterpret_cast<const char*>(ahead + line), _MM_HINT_T0);
    __m256 px[3];
    loadPixels(s + 3 * x, px);
    const __m256i fg = _mm256_castps_si256(processPair<K>(g, g + kGroup, px, f));
    // Lanes 0..3 and 4..7 as bytes: pack within each half, then join.
    const __m256i bytes = _mm256_packs_epi16(_mm256_packs_epi32(fg, fg), fg);
    const uint32_t low = uint32_t(_mm_cvtsi128_si32(_mm256_castsi256_si128(bytes)));
    const uint32_t high = uint32_t(_mm_cvtsi128_si32(_mm256_extracti128_si256(bytes, 1)));
    memcpy(d + x, &low, 4);
    memcpy(d + x + 4, &high, 4);
  }
  return x;
}

}  // namespace

int fgmmRow(int components, const uint8_t* src, uint8_t* dst, float* g, int width, const FrameScalars& s) {
  Consts f;
  f.a = _mm256_set1_ps(s.a);
  f.b = _mm256_set1_ps(s.b);
  f.c = _mm256_set1_ps(s.c);
  f.tb = _mm256_set1_ps(s.tb);
  f.tg = _mm256_set1_ps(s.tg);
  f.ratio = _mm256_set1_ps(s.ratio);
  f.varInit = _mm256_set1_ps(s.varInit);
  f.varMin = _mm256_set1_ps(s.varMin);
  f.varMax = _mm256_set1_ps(s.varMax);
  f.one = _mm256_set1_ps(1.0f);
  f.zero = _mm256_setzero_ps();
  switch (components) {
    case 1: return runRow<1>(src, dst, g, width, f);
    case 2: return runRow<2>(src, dst, g, width, f);
    case 3: return runRow<3>(src, dst, g, width, f);
    case 4: return runRow<4>(src, dst, g, width, f);
    case 5: return runRow<5>(src, dst, g, width, f);
    case 6: return runRow<6>(src, dst, g, width, f);
    case 7: return runRow<7>(src, dst, g, width, f);
    default: return runRow<8>(src, dst, g, width, f);
  }
}

}  // namespace avx2
}  // namespace zelcv
