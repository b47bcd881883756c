// The Gaussian-mixture background model. Pixels are kept in groups of four,
// each group's components stored as whole vectors (weight, three means,
// variance per component), so that one SSE2 pass evaluates four pixels with
// no gathering; every lane follows the scalar rules of the header exactly.
#include <emmintrin.h>
#include <math.h>
#include <string.h>

#include <type_traits>

#include "core/status.h"
#include "kernels/dispatch.h"
#include "motion/background_state.h"
#include "motion/fgmm_kernels.h"

namespace zelcv {
namespace background {
namespace {

constexpr int kMaxComponents = 8;
constexpr uint32_t kFrameCap = 1u << 30;

struct MixtureModel {
  Head head;
  int32_t components;
  int32_t groups;  // groups of four pixels per row
  uint32_t frames;
  ZeliFGMMParams p;
};
static_assert(sizeof(MixtureModel) <= 64, "head area is 64 bytes");

SizeCalc payloadBytes(ZeliSize roi, int k) {
  return SizeCalc((int64_t(roi.width) + 3) / 4) * SizeCalc(roi.height) * SizeCalc(int64_t(k) * kFields * 16);
}

inline MixtureModel* modelOf(const void* block) {
  return reinterpret_cast<MixtureModel*>(alignUp(const_cast<void*>(block), 64));
}
inline float* componentsOf(const MixtureModel* m) {
  return reinterpret_cast<float*>(reinterpret_cast<uint8_t*>(const_cast<MixtureModel*>(m)) + 64);
}

bool paramsValid(const ZeliFGMMParams& p) {
  return p.alpha > 0.0f && p.alpha <= 1.0f && finitePositive(p.varThreshold) && finitePositive(p.varThresholdGen) &&
         p.backgroundRatio > 0.0f && p.backgroundRatio <= 1.0f && finitePositive(p.varMin) &&
         p.varMin <= p.varInit && p.varInit <= p.varMax && finitePositive(p.varMax) && p.complexity >= 0.0f &&
         p.complexity < 1.0f;
}

// Three planar float vectors from four interleaved 8u C3 pixels (n valid;
// the other lanes repeat the last one).
inline void loadPixels(const Zel8u* s, int n, __m128* x) {
  alignas(16) float c[3][4];
  for (int i = 0; i < 4; ++i) {
    const Zel8u* p = s + 3 * (i < n ? i : n - 1);
    c[0][i] = p[0];
    c[1][i] = p[1];
    c[2][i] = p[2];
  }
  x[0] = _mm_load_ps(c[0]);
  x[1] = _mm_load_ps(c[1]);
  x[2] = _mm_load_ps(c[2]);
}

struct FrameConstants {
  __m128 a, b, c, tb, tg, ratio, varInit, varMin, varMax, one, zero;
};

inline __m128 blend(__m128 mask, __m128 yes, __m128 no) {
  return _mm_or_ps(_mm_and_ps(mask, yes), _mm_andnot_ps(mask, no));
}

// One group of four pixels: returns the foreground lanes as all-ones.
template <int K>
inline __m128 processGroup(float* g, const __m128* x, const FrameConstants& f) {
  __m128 w[K], e[K][3], dist[K];
  for (int k = 0; k < K; ++k) {
    const float* c = g + k * kFields * 4;
    w[k] = _mm_load_ps(c);
    for (int j = 0; j < 3; ++j) e[k][j] = _mm_sub_ps(x[j], _mm_load_ps(c + 4 * (1 + j)));
    dist[k] = _mm_add_ps(_mm_add_ps(_mm_mul_ps(e[k][0], e[k][0]), _mm_mul_ps(e[k][1], e[k][1])),
                         _mm_mul_ps(e[k][2], e[k][2]));
  }
  // Foreground rule and match, on the model before this frame.
  __m128 background = f.zero, bestW = _mm_set1_ps(-1.0f), bestIdx = _mm_set1_ps(-1.0f);
  for (int k = 0; k < K; ++k) {
    const __m128 v = _mm_load_ps(g + k * kFields * 4 + 16);
    const __m128 used = _mm_cmpgt_ps(w[k], f.zero);
    const __m128 close = _mm_and_ps(used, _mm_cmplt_ps(dist[k], _mm_mul_ps(f.tb, v)));
    // The rank sum only matters where the component is close; usually one
    // component per pixel is, so most groups skip most sums.
    if (_mm_movemask_ps(close)) {
      __m128 ranked = f.zero;
      for (int j = 0; j < K; ++j) {
        if (j == k) continue;
        const __m128 before = j < k ? _mm_cmpge_ps(w[j], w[k]) : _mm_cmpgt_ps(w[j], w[k]);
        ranked = _mm_add_ps(ranked, _mm_and_ps(before, w[j]));
      }
      background = _mm_or_ps(background, _mm_and_ps(close, _mm_cmplt_ps(ranked, f.ratio)));
    }
    const __m128 take =
        _mm_and_ps(_mm_and_ps(used, _mm_cmplt_ps(dist[k], _mm_mul_ps(f.tg, v))), _mm_cmpgt_ps(w[k], bestW));
    bestW = blend(take, w[k], bestW);
    bestIdx = blend(take, _mm_set1_ps(float(k)), bestIdx);
  }
  // Weights, the matched component's weight and the lightest component.
  __m128 nw[K], matched[K], matchedW = f.zero;
  for (int k = 0; k < K; ++k) {
    matched[k] = _mm_cmpeq_ps(bestIdx, _mm_set1_ps(float(k)));
    const __m128 t = _mm_add_ps(_mm_sub_ps(_mm_mul_ps(w[k], f.b), f.c), _mm_and_ps(matched[k], f.a));
    nw[k] = _mm_and_ps(_mm_cmpgt_ps(t, f.zero), t);
    matchedW = _mm_add_ps(matchedW, _mm_and_ps(matched[k], nw[k]));
  }
  const __m128 noMatch = _mm_cmplt_ps(bestIdx, f.zero);
  __m128 minW = nw[0], minIdx = f.zero;
  for (int k = 1; k < K; ++k) {
    const __m128 lighter = _mm_cmplt_ps(nw[k], minW);
    minW = blend(lighter, nw[k], minW);
    minIdx = blend(lighter, _mm_set1_ps(float(k)), minIdx);
  }
  // Lanes without a match divide by zero here; their r is never used.
  const __m128 r = _mm_min_ps(_mm_div_ps(f.a, blend(noMatch, f.one, matchedW)), f.one);
  for (int k = 0; k < K; ++k) {
    float* c = g + k * kFields * 4;
    const __m128 replace = _mm_and_ps(noMatch, _mm_cmpeq_ps(minIdx, _mm_set1_ps(float(k))));
    nw[k] = blend(replace, f.a, nw[k]);
    for (int j = 0; j < 3; ++j) {
      const __m128 u = _mm_load_ps(c + 4 * (1 + j));
      const __m128 moved = blend(matched[k], _mm_add_ps(u, _mm_mul_ps(r, e[k][j])), u);
      _mm_store_ps(c + 4 * (1 + j), blend(replace, x[j], moved));
    }
    const __m128 v = _mm_load_ps(c + 16);
    const __m128 nv =
        _mm_min_ps(_mm_max_ps(_mm_add_ps(v, _mm_mul_ps(r, _mm_sub_ps(dist[k], v))), f.varMin), f.varMax);
    _mm_store_ps(c + 16, blend(replace, f.varInit, blend(matched[k], nv, v)));
  }
  __m128 sum = nw[0];
  for (int k = 1; k < K; ++k) sum = _mm_add_ps(sum, nw[k]);
  for (int k = 0; k < K; ++k) _mm_store_ps(g + k * kFields * 4, _mm_div_ps(nw[k], sum));
  return _mm_andnot_ps(background, _mm_castsi128_ps(_mm_set1_epi32(-1)));
}

enum class Wide { None, Avx2, Avx512 };

// The widest kernel takes each row's pixels sixteen or eight at a time, the
// AVX2 one a last eight, and this loop the rest. The AVX-512 kernel pays
// from four components on; with fewer the state streams through memory as
// fast with AVX2, whose loads need no assembling of four groups.
template <int K>
void runFrame(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, MixtureModel* m, const FrameConstants& f,
              const FrameScalars& scalars, Wide wide) {
  float* comps = componentsOf(m);
  const int width = m->head.width;
  for (int y = 0; y < m->head.height; ++y) {
    const Zel8u* s = src + int64_t(y) * srcStep;
    Zel8u* d = dst + int64_t(y) * dstStep;
    float* g = comps + int64_t(y) * m->groups * K * kFields * 4;
    int done = 0;
    if (K >= 4 && wide == Wide::Avx512) done = avx512::fgmmRow(K, s, d, g, width, scalars);
    if (wide != Wide::None) done += avx2::fgmmRow(K, s + 3 * done, d + done, g + (done / 4) * K * kFields * 4,
                                                  width - done, scalars);
    g += (done / 4) * K * kFields * 4;
    for (int x = done; x < width; x += 4, g += K * kFields * 4) {
      const int n = width - x < 4 ? width - x : 4;
      __m128 px[3];
      loadPixels(s + 3 * x, n, px);
      const __m128i fg = _mm_castps_si128(processGroup<K>(g, px, f));
      const __m128i bytes = _mm_packs_epi16(_mm_packs_epi32(fg, fg), fg);
      if (n == 4) {
        const int32_t v = _mm_cvtsi128_si32(bytes);
        memcpy(d + x, &v, 4);
      } else {
        alignas(16) uint8_t lanes[16];
        _mm_store_si128(reinterpret_cast<__m128i*>(lanes), bytes);
        memcpy(d + x, lanes, size_t(n));
      }
    }
  }
}

}  // namespace
}  // namespace background
}  // namespace zelcv

using namespace zelcv;
using namespace zelcv::background;

ZELCV_ENTRY(zeliFGMMGetBufferSize_8u_C3R)(ZeliSize roiSize, int numComponents, int* size) {
  if (ZelStatus s = checkSizeQuery(roiSize, size)) return s;
  if (numComponents < 1 || numComponents > kMaxComponents) return zelStatusBadRange;
  const int64_t bytes = blockBytes(payloadBytes(roiSize, numComponents));
  if (bytes < 0) return zelStatusBadSize;
  *size = int(bytes);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliFGMMInit_8u_C3R)(ZeliSize roiSize, int numComponents, const ZeliFGMMParams* params,
                                 ZeliFGMMState* state) {
  if (ZelStatus s = checkSizeQuery(roiSize, state)) return s;
  if (numComponents < 1 || numComponents > kMaxComponents) return zelStatusBadRange;
  const SizeCalc payload = payloadBytes(roiSize, numComponents);
  if (blockBytes(payload) < 0) return zelStatusBadSize;
  const ZeliFGMMParams p =
      params ? *params : ZeliFGMMParams{0.002f, 16.0f, 9.0f, 0.9f, 15.0f, 4.0f, 75.0f, 0.05f};
  if (!paramsValid(p)) return zelStatusBadRange;
  MixtureModel* m = modelOf(state);
  m->head = {kTagMixture, roiSize.width, roiSize.height};
  m->components = numComponents;
  m->groups = int32_t((int64_t(roiSize.width) + 3) / 4);
  m->frames = 0;
  m->p = p;
  memset(componentsOf(m), 0, size_t(payload.value()));
  return zelStatusOk;
}

ZELCV_ENTRY(zeliFGMMForeground_8u_C3R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                       ZeliFGMMState* state) {
  if (ZelStatus s = checkImages({image(src, srcStep, 3), maskImage(dst, dstStep)}, roiSize, {state})) return s;
  MixtureModel* m = modelOf(state);
  if (ZelStatus s = checkModel(&m->head, kTagMixture, roiSize)) return s;
  const ZeliFGMMParams& p = m->p;
  const float first = 1.0f / float(2 * m->frames + 2);
  const float a = p.alpha > first ? p.alpha : first;
  const FrameScalars scalars{a, 1.0f - a, a * p.complexity, p.varThreshold, p.varThresholdGen,
                             p.backgroundRatio, p.varInit, p.varMin, p.varMax};
  const Wide wide = withChosenIsa<IsaLevel::Avx512>([](auto tag) {
    using Isa = typename decltype(tag)::Isa;
    return std::is_same<Isa, simd::Sse2>::value ? Wide::None
           : std::is_same<Isa, avx2::Isa>::value ? Wide::Avx2
                                                  : Wide::Avx512;
  });
  FrameConstants f;
  f.a = _mm_set1_ps(a);
  f.b = _mm_set1_ps(1.0f - a);
  f.c = _mm_set1_ps(a * p.complexity);
  f.tb = _mm_set1_ps(p.varThreshold);
  f.tg = _mm_set1_ps(p.varThresholdGen);
  f.ratio = _mm_set1_ps(p.backgroundRatio);
  f.varInit = _mm_set1_ps(p.varInit);
  f.varMin = _mm_set1_ps(p.varMin);
  f.varMax = _mm_set1_ps(p.varMax);
  f.one = _mm_set1_ps(1.0f);
  f.zero = _mm_setzero_ps();
  switch (m->components) {
    case 1: runFrame<1>(src, srcStep, dst, dstStep, m, f, scalars, wide); break;
    case 2: runFrame<2>(src, srcStep, dst, dstStep, m, f, scalars, wide); break;
    case 3: runFrame<3>(src, srcStep, dst, dstStep, m, f, scalars, wide); break;
    case 4: runFrame<4>(src, srcStep, dst, dstStep, m, f, scalars, wide); break;
    case 5: runFrame<5>(src, srcStep, dst, dstStep, m, f, scalars, wide); break;
    case 6: runFrame<6>(src, srcStep, dst, dstStep, m, f, scalars, wide); break;
    case 7: runFrame<7>(src, srcStep, dst, dstStep, m, f, scalars, wide); break;
    default: runFrame<8>(src, srcStep, dst, dstStep, m, f, scalars, wide); break;
  }
  if (m->frames < kFrameCap) ++m->frames;
  return zelStatusOk;
}

ZELCV_ENTRY(zeliFGMMBackground_8u_C3R)(Zel8u* dst, int dstStep, ZeliSize roiSize, const ZeliFGMMState* state) {
  if (ZelStatus s = checkImages({image(dst, dstStep, 3)}, roiSize, {state})) return s;
  const MixtureModel* m = modelOf(state);
  if (ZelStatus s = checkModel(&m->head, kTagMixture, roiSize)) return s;
  const int K = m->components;
  const float* comps = componentsOf(m);
  for (int y = 0; y < roiSize.height; ++y) {
    Zel8u* d = dst + int64_t(y) * dstStep;
    for (int x = 0; x < roiSize.width; ++x) {
      const float* g = comps + (int64_t(y) * m->groups + x / 4) * K * kFields * 4;
      const int lane = x & 3;
      int best = -1;
      float bestW = 0.0f;
      for (int k = 0; k < K; ++k) {
        const float w = g[k * kFields * 4 + lane];
        if (w > bestW) bestW = w, best = k;
      }
      for (int j = 0; j < 3; ++j) {
        float v = 0.0f;
        if (best >= 0) v = floorf(g[best * kFields * 4 + 4 * (1 + j) + lane] + 0.5f);
        d[3 * x + j] = Zel8u(v < 0.0f ? 0.0f : v > 255.0f ? 255.0f : v);
      }
    }
  }
  return zelStatusOk;
}
