// The mixture model's AVX-512 kernel: sixteen pixels per pass, four groups
// of four side by side in the quarters of each vector, lane masks in place
// of blends. Every sum, product and quotient is the baseline's (no fused
// multiply-add); a masked addition stands for adding the and of a mask,
// which adds +0 where the mask is clear and leaves the value (never -0)
// unchanged. So every lane gives the same bits.
#include <stdint.h>
#include <string.h>

#include "kernels/simd_avx512.h"
#include "motion/fgmm_kernels.h"

namespace zelcv {
namespace avx512 {

namespace {

using background::FrameScalars;
using background::kFields;

struct Consts {
  __m512 a, b, c, tb, tg, ratio, varInit, varMin, varMax, one, zero;
};

// The four groups of a pass, each K * kFields * 4 floats after the last.
struct Quad {
  float* g[4];
};

inline __m512 load4(const Quad& q, int o) {
  __m512 v = _mm512_castps128_ps512(_mm_load_ps(q.g[0] + o));
  v = _mm512_insertf32x4(v, _mm_load_ps(q.g[1] + o), 1);
  v = _mm512_insertf32x4(v, _mm_load_ps(q.g[2] + o), 2);
  return _mm512_insertf32x4(v, _mm_load_ps(q.g[3] + o), 3);
}
inline void store4(const Quad& q, int o, __m512 v) {
  _mm_store_ps(q.g[0] + o, _mm512_castps512_ps128(v));
  _mm_store_ps(q.g[1] + o, _mm512_extractf32x4_ps(v, 1));
  _mm_store_ps(q.g[2] + o, _mm512_extractf32x4_ps(v, 2));
  _mm_store_ps(q.g[3] + o, _mm512_extractf32x4_ps(v, 3));
}
inline __mmask16 gt(__m512 a, __m512 b) { return _mm512_cmp_ps_mask(a, b, _CMP_GT_OQ); }
inline __mmask16 lt(__m512 a, __m512 b) { return _mm512_cmp_ps_mask(a, b, _CMP_LT_OQ); }
inline __mmask16 ge(__m512 a, __m512 b) { return _mm512_cmp_ps_mask(a, b, _CMP_GE_OQ); }
inline __mmask16 eq(__m512 a, __m512 b) { return _mm512_cmp_ps_mask(a, b, _CMP_EQ_OQ); }

// Eight interleaved 8u C3 pixels (24 bytes) as three vectors of 8 bytes.
inline void splitPixels(const uint8_t* s, __m128i* c) {
  const __m128i lo = _mm_loadu_si128(reinterpret_cast<const __m128i*>(s));
  const __m128i hi = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(s + 16));
  c[0] = _mm_or_si128(_mm_shuffle_epi8(lo, _mm_setr_epi8(0, 3, 6, 9, 12, 15, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1)),
                      _mm_shuffle_epi8(hi, _mm_setr_epi8(-1, -1, -1, -1, -1, -1, 2, 5, -1, -1, -1, -1, -1, -1, -1, -1)));
  c[1] = _mm_or_si128(_mm_shuffle_epi8(lo, _mm_setr_epi8(1, 4, 7, 10, 13, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1)),
                      _mm_shuffle_epi8(hi, _mm_setr_epi8(-1, -1, -1, -1, -1, 0, 3, 6, -1, -1, -1, -1, -1, -1, -1, -1)));
  c[2] = _mm_or_si128(_mm_shuffle_epi8(lo, _mm_setr_epi8(2, 5, 8, 11, 14, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1)),
                      _mm_shuffle_epi8(hi, _mm_setr_epi8(-1, -1, -1, -1, -1, 1, 4, 7, -1, -1, -1, -1, -1, -1, -1, -1)));
}

// Sixteen pixels (48 bytes) as three planar float vectors.
inline void loadPixels(const uint8_t* s, __m512* x) {
  __m128i a[3], b[3];
  splitPixels(s, a);
  splitPixels(s + 24, b);
  for (int j = 0; j < 3; ++j) x[j] = _mm512_cvtepi32_ps(_mm512_cvtepu8_epi32(_mm_unpacklo_epi64(a[j], b[j])));
}

// Four groups: returns the foreground lanes. The steps of the AVX2 kernel,
// including its skipping of components unused in every lane.
template <int K>
inline __mmask16 processQuad(const Quad& q, const __m512* x, const Consts& f) {
  __m512 w[K], e[K][3], dist[K], v[K];
  bool live[K];
  for (int k = 0; k < K; ++k) {
    const int o = k * kFields * 4;
    w[k] = load4(q, o);
    live[k] = gt(w[k], f.zero) != 0;
    if (!live[k]) continue;
    for (int j = 0; j < 3; ++j) e[k][j] = _mm512_sub_ps(x[j], load4(q, o + 4 * (1 + j)));
    dist[k] = _mm512_add_ps(_mm512_add_ps(_mm512_mul_ps(e[k][0], e[k][0]), _mm512_mul_ps(e[k][1], e[k][1])),
                            _mm512_mul_ps(e[k][2], e[k][2]));
    v[k] = load4(q, o + 16);
  }
  __mmask16 background = 0;
  __m512 bestW = _mm512_set1_ps(-1.0f), bestIdx = _mm512_set1_ps(-1.0f);
  for (int k = 0; k < K; ++k) {
    if (!live[k]) continue;
    const __mmask16 used = gt(w[k], f.zero);
    const __mmask16 close = used & lt(dist[k], _mm512_mul_ps(f.tb, v[k]));
    if (close) {
      __m512 ranked = f.zero;
      for (int j = 0; j < K; ++j) {
        if (j == k || !live[j]) continue;
        const __mmask16 before = j < k ? ge(w[j], w[k]) : gt(w[j], w[k]);
        ranked = _mm512_mask_add_ps(ranked, before, ranked, w[j]);
      }
      background |= close & lt(ranked, f.ratio);
    }
    const __mmask16 take = used & lt(dist[k], _mm512_mul_ps(f.tg, v[k])) & gt(w[k], bestW);
    bestW = _mm512_mask_mov_ps(bestW, take, w[k]);
    bestIdx = _mm512_mask_mov_ps(bestIdx, take, _mm512_set1_ps(float(k)));
  }
  __m512 nw[K], matchedW = f.zero;
  __mmask16 matched[K];
  for (int k = 0; k < K; ++k) {
    if (!live[k]) {
      nw[k] = f.zero;
      matched[k] = 0;
      continue;
    }
    matched[k] = eq(bestIdx, _mm512_set1_ps(float(k)));
    const __m512 base = _mm512_sub_ps(_mm512_mul_ps(w[k], f.b), f.c);
    const __m512 t = _mm512_mask_add_ps(base, matched[k], base, f.a);
    nw[k] = _mm512_maskz_mov_ps(gt(t, f.zero), t);
    matchedW = _mm512_mask_add_ps(matchedW, matched[k], matchedW, nw[k]);
  }
  const __mmask16 noMatch = lt(bestIdx, f.zero);
  __m512 minW = nw[0], minIdx = f.zero;
  for (int k = 1; k < K; ++k) {
    const __mmask16 lighter = lt(nw[k], minW);
    minW = _mm512_mask_mov_ps(minW, lighter, nw[k]);
    minIdx = _mm512_mask_mov_ps(minIdx, lighter, _mm512_set1_ps(float(k)));
  }
  const __m512 r = _mm512_min_ps(_mm512_div_ps(f.a, _mm512_mask_mov_ps(matchedW, noMatch, f.one)), f.one);
  bool keep[K];
  for (int k = 0; k < K; ++k) {
    const int o = k * kFields * 4;
    const __mmask16 replace = noMatch & eq(minIdx, _mm512_set1_ps(float(k)));
    nw[k] = _mm512_mask_mov_ps(nw[k], replace, f.a);
    keep[k] = !live[k] && !replace;
    if (!live[k]) {
      if (!replace) continue;
      for (int j = 0; j < 3; ++j) store4(q, o + 4 * (1 + j), _mm512_mask_mov_ps(load4(q, o + 4 * (1 + j)), replace, x[j]));
      store4(q, o + 16, _mm512_mask_mov_ps(load4(q, o + 16), replace, f.varInit));
    } else if (replace | matched[k]) {
      for (int j = 0; j < 3; ++j) {
        const __m512 u = load4(q, o + 4 * (1 + j));
        const __m512 moved = _mm512_mask_mov_ps(u, matched[k], _mm512_add_ps(u, _mm512_mul_ps(r, e[k][j])));
        store4(q, o + 4 * (1 + j), _mm512_mask_mov_ps(moved, replace, x[j]));
      }
      const __m512 nv = _mm512_min_ps(
          _mm512_max_ps(_mm512_add_ps(v[k], _mm512_mul_ps(r, _mm512_sub_ps(dist[k], v[k]))), f.varMin), f.varMax);
      store4(q, o + 16, _mm512_mask_mov_ps(_mm512_mask_mov_ps(v[k], matched[k], nv), replace, f.varInit));
    }
  }
  __m512 sum = nw[0];
  for (int k = 1; k < K; ++k) sum = _mm512_add_ps(sum, nw[k]);
  for (int k = 0; k < K; ++k)
    if (!keep[k]) store4(q, k * kFields * 4, _mm512_div_ps(nw[k], sum));
  return __mmask16(~background);
}

template <int K>
int runRow(const uint8_t* s, uint8_t* d, float* g, int width, const Consts& f) {
  constexpr int kGroup = K * kFields * 4;
  int x = 0;
  for (; x + 16 <= width; x += 16, g += 4 * kGroup) {
    // As in the AVX2 kernel: the groups two passes ahead.
    const uintptr_t ahead = reinterpret_cast<uintptr_t>(g) + 8 * kGroup * sizeof(float);
    for (int line = 0; line < 4 * kGroup * 4; line += 64)
      _mm_prefetch(reinterpret_cast<const char*>(ahead + line), _MM_HINT_T0);
    __m512 px[3];
    loadPixels(s + 3 * x, px);
    const Quad q{{g, g + kGroup, g + 2 * kGroup, g + 3 * kGroup}};
    const __mmask16 fg = processQuad<K>(q, px, f);
    _mm_storeu_si128(reinterpret_cast<__m128i*>(d + x), _mm512_castsi512_si128(_mm512_movm_epi8(fg)));
  }
  return x;
}

}  // namespace

int fgmmRow(int components, const uint8_t* src, uint8_t* dst, float* g, int width, const FrameScalars& s) {
  Consts f;
  f.a = _mm512_set1_ps(s.a);
  f.b = _mm512_set1_ps(s.b);
  f.c = _mm512_set1_ps(s.c);
  f.tb = _mm512_set1_ps(s.tb);
  f.tg = _mm512_set1_ps(s.tg);
  f.ratio = _mm512_set1_ps(s.ratio);
  f.varInit = _mm512_set1_ps(s.varInit);
  f.varMin = _mm512_set1_ps(s.varMin);
  f.varMax = _mm512_set1_ps(s.varMax);
  f.one = _mm512_set1_ps(1.0f);
  f.zero = _mm512_setzero_ps();
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

}  // namespace avx512
}  // namespace zelcv
