// The histogram and Gaussian foreground models: one model per pixel and
// channel, built from a first frame, queried for a mask and updated with
// later frames.
#include <emmintrin.h>
#include <math.h>
#include <string.h>

#include "core/status.h"
#include "kernels/simd.h"
#include "motion/background_state.h"

namespace zelcv {
namespace background {
namespace {

constexpr int kBins = 16;

struct HistogramModel {
  Head head;
  int32_t channels;
  uint32_t thresholdQ16;
};

struct GaussianModel {
  Head head;
  int32_t channels;
  float alpha;
  float k2;
  float minVariance;
};

static_assert(sizeof(HistogramModel) <= 64 && sizeof(GaussianModel) <= 64, "head area is 64 bytes");

inline uint8_t* payloadOf(const void* model) {
  return alignUp(const_cast<uint8_t*>(static_cast<const uint8_t*>(model)) + 1, 64);
}

// Elements (pixels x channels) of one model row and of the whole model.
inline int64_t rowElements(const Head& h, int channels) { return int64_t(h.width) * channels; }

// ---- Histogram ----------------------------------------------------------

ZelStatus histogramInit(const Zel8u* src, int srcStep, ZeliSize roi, ZeliFGHistogramState** state,
                        const ZeliFGHistogramParams* params, int channels) {
  if (ZelStatus s = checkImages({image(src, srcStep, channels)}, roi, {state})) return s;
  const SizeCalc counts = SizeCalc(roi.width) * SizeCalc(roi.height) * SizeCalc(channels * kBins);
  const int64_t bytes = blockBytes(counts);
  if (bytes < 0) return zelStatusBadSize;
  const float threshold = params ? params->threshold : 0.05f;
  const int initCount = params ? params->initCount : 32;
  if (!(threshold > 0.0f && threshold <= 1.0f) || initCount < 1 || initCount > 255) return zelStatusBadRange;

  void* block = allocBytes(int(bytes));
  if (!block) return zelStatusOutOfMemory;
  HistogramModel* m = static_cast<HistogramModel*>(block);
  m->head = {channels == 1 ? kTagHistogram1 : kTagHistogram3, roi.width, roi.height};
  m->channels = channels;
  const double q = floor(double(threshold) * 65536.0 + 0.5);
  m->thresholdQ16 = q < 1.0 ? 1u : uint32_t(q);
  uint8_t* c = payloadOf(m);
  const int64_t n = rowElements(m->head, channels);
  memset(c, 0, size_t(counts.value()));
  for (int y = 0; y < roi.height; ++y) {
    const Zel8u* s = src + int64_t(y) * srcStep;
    uint8_t* row = c + int64_t(y) * n * kBins;
    for (int64_t e = 0; e < n; ++e) row[e * kBins + (s[e] >> 4)] = uint8_t(initCount);
  }
  *state = reinterpret_cast<ZeliFGHistogramState*>(m);
  return zelStatusOk;
}

inline uint32_t sumOf16(__m128i counts) {
  const __m128i sad = _mm_sad_epu8(counts, _mm_setzero_si128());
  return uint32_t(_mm_cvtsi128_si32(sad) + _mm_cvtsi128_si32(_mm_srli_si128(sad, 8)));
}

ZelStatus histogramDetect(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roi,
                          const ZeliFGHistogramState* state, int channels) {
  if (ZelStatus s = checkImages({image(src, srcStep, channels), maskImage(dst, dstStep)}, roi, {state})) return s;
  const HistogramModel* m = reinterpret_cast<const HistogramModel*>(state);
  if (ZelStatus s = checkModel(&m->head, channels == 1 ? kTagHistogram1 : kTagHistogram3, roi)) return s;
  const uint8_t* c = payloadOf(m);
  const int64_t n = rowElements(m->head, channels);
  const uint32_t q = m->thresholdQ16;
  for (int y = 0; y < roi.height; ++y) {
    const Zel8u* s = src + int64_t(y) * srcStep;
    const uint8_t* row = c + int64_t(y) * n * kBins;
    Zel8u* d = dst + int64_t(y) * dstStep;
    for (int x = 0; x < roi.width; ++x) {
      bool foreground = false;
      for (int ch = 0; ch < channels; ++ch) {
        const int64_t e = int64_t(x) * channels + ch;
        const uint8_t* h = row + e * kBins;
        const uint32_t total = sumOf16(_mm_load_si128(reinterpret_cast<const __m128i*>(h)));
        foreground |= uint32_t(h[s[e] >> 4]) * 65536u < q * total;
      }
      d[x] = foreground ? 255 : 0;
    }
  }
  return zelStatusOk;
}

ZelStatus histogramUpdate(const Zel8u* src, int srcStep, ZeliSize roi, ZeliFGHistogramState* state,
                          int channels) {
  if (ZelStatus s = checkImages({image(src, srcStep, channels)}, roi, {state})) return s;
  HistogramModel* m = reinterpret_cast<HistogramModel*>(state);
  if (ZelStatus s = checkModel(&m->head, channels == 1 ? kTagHistogram1 : kTagHistogram3, roi)) return s;
  uint8_t* c = payloadOf(m);
  const int64_t n = rowElements(m->head, channels);
  const __m128i low7 = _mm_set1_epi8(0x7f);
  for (int y = 0; y < roi.height; ++y) {
    const Zel8u* s = src + int64_t(y) * srcStep;
    uint8_t* row = c + int64_t(y) * n * kBins;
    for (int64_t e = 0; e < n; ++e) {
      uint8_t* h = row + e * kBins;
      const int b = s[e] >> 4;
      if (h[b] == 255) {
        __m128i* v = reinterpret_cast<__m128i*>(h);
        _mm_store_si128(v, _mm_and_si128(_mm_srli_epi16(_mm_load_si128(v), 1), low7));
      }
      h[b] = uint8_t(h[b] + 1);
    }
  }
  return zelStatusOk;
}

// ---- Gaussian -----------------------------------------------------------

ZelStatus gaussianInit(const Zel8u* src, int srcStep, ZeliSize roi, ZeliFGGaussianState** state,
                       const ZeliFGGaussianParams* params, int channels) {
  if (ZelStatus s = checkImages({image(src, srcStep, channels)}, roi, {state})) return s;
  const SizeCalc plane = alignSize(SizeCalc(roi.width) * SizeCalc(roi.height) * SizeCalc(channels * 4), 64);
  const int64_t bytes = blockBytes(plane + plane);
  if (bytes < 0) return zelStatusBadSize;
  const ZeliFGGaussianParams p = params ? *params : ZeliFGGaussianParams{0.01f, 2.5f, 225.0f, 4.0f};
  if (!(p.alpha > 0.0f && p.alpha <= 1.0f) || !finitePositive(p.k) || !finitePositive(p.initVariance) ||
      !finitePositive(p.minVariance))
    return zelStatusBadRange;

  void* block = allocBytes(int(bytes));
  if (!block) return zelStatusOutOfMemory;
  GaussianModel* m = static_cast<GaussianModel*>(block);
  m->head = {channels == 1 ? kTagGaussian1 : kTagGaussian3, roi.width, roi.height};
  m->channels = channels;
  m->alpha = p.alpha;
  m->k2 = p.k * p.k;
  m->minVariance = p.minVariance;
  float* mean = reinterpret_cast<float*>(payloadOf(m));
  float* var = mean + plane.value() / 4;
  const int64_t n = rowElements(m->head, channels);
  for (int y = 0; y < roi.height; ++y) {
    const Zel8u* s = src + int64_t(y) * srcStep;
    for (int64_t e = 0; e < n; ++e) {
      mean[y * n + e] = float(s[e]);
      var[y * n + e] = p.initVariance;
    }
  }
  *state = reinterpret_cast<ZeliFGGaussianState*>(m);
  return zelStatusOk;
}

struct GaussianPlanes {
  float* mean;
  float* var;
};

inline GaussianPlanes planesOf(const GaussianModel* m) {
  const SizeCalc plane =
      alignSize(SizeCalc(m->head.width) * SizeCalc(m->head.height) * SizeCalc(m->channels * 4), 64);
  float* mean = reinterpret_cast<float*>(payloadOf(m));
  return {mean, mean + plane.value() / 4};
}

// Four 8-bit values as floats.
inline __m128 load4(const Zel8u* p) {
  int32_t bits;
  memcpy(&bits, p, 4);
  const __m128i z = _mm_setzero_si128();
  return _mm_cvtepi32_ps(_mm_unpacklo_epi16(_mm_unpacklo_epi8(_mm_cvtsi32_si128(bits), z), z));
}

// Foreground flags (0 or 1) of n elements of one row.
void gaussianFlags(const Zel8u* s, const float* mean, const float* var, int64_t n, float k2, uint8_t* flags) {
  int64_t e = 0;
  const __m128 vk2 = _mm_set1_ps(k2);
  for (; e + 16 <= n; e += 16) {
    __m128i part[4];
    for (int q = 0; q < 4; ++q) {
      const __m128 d = _mm_sub_ps(load4(s + e + 4 * q), _mm_loadu_ps(mean + e + 4 * q));
      const __m128 fg = _mm_cmpgt_ps(_mm_mul_ps(d, d), _mm_mul_ps(vk2, _mm_loadu_ps(var + e + 4 * q)));
      part[q] = _mm_srli_epi32(_mm_castps_si128(fg), 31);
    }
    const __m128i packed = _mm_packs_epi16(_mm_packs_epi32(part[0], part[1]), _mm_packs_epi32(part[2], part[3]));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(flags + e), packed);
  }
  for (; e < n; ++e) {
    const float d = float(s[e]) - mean[e];
    flags[e] = d * d > k2 * var[e];
  }
}

ZelStatus gaussianDetect(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roi,
                         const ZeliFGGaussianState* state, int channels) {
  if (ZelStatus s = checkImages({image(src, srcStep, channels), maskImage(dst, dstStep)}, roi, {state})) return s;
  const GaussianModel* m = reinterpret_cast<const GaussianModel*>(state);
  if (ZelStatus s = checkModel(&m->head, channels == 1 ? kTagGaussian1 : kTagGaussian3, roi)) return s;
  const GaussianPlanes p = planesOf(m);
  const int64_t n = rowElements(m->head, channels);
  // Flags in chunks of 64 pixels, folded per pixel.
  constexpr int kChunk = 64;
  uint8_t flags[kChunk * 3];
  for (int y = 0; y < roi.height; ++y) {
    const Zel8u* s = src + int64_t(y) * srcStep;
    Zel8u* d = dst + int64_t(y) * dstStep;
    for (int x0 = 0; x0 < roi.width; x0 += kChunk) {
      const int count = roi.width - x0 < kChunk ? roi.width - x0 : kChunk;
      const int64_t e0 = int64_t(x0) * channels;
      gaussianFlags(s + e0, p.mean + y * n + e0, p.var + y * n + e0, int64_t(count) * channels, m->k2, flags);
      for (int x = 0; x < count; ++x) {
        int f = flags[x * channels];
        for (int ch = 1; ch < channels; ++ch) f |= flags[x * channels + ch];
        d[x0 + x] = f ? 255 : 0;
      }
    }
  }
  return zelStatusOk;
}

ZelStatus gaussianUpdate(const Zel8u* src, int srcStep, ZeliSize roi, ZeliFGGaussianState* state, int channels) {
  if (ZelStatus s = checkImages({image(src, srcStep, channels)}, roi, {state})) return s;
  GaussianModel* m = reinterpret_cast<GaussianModel*>(state);
  if (ZelStatus s = checkModel(&m->head, channels == 1 ? kTagGaussian1 : kTagGaussian3, roi)) return s;
  const GaussianPlanes p = planesOf(m);
  const int64_t n = rowElements(m->head, channels);
  const float alpha = m->alpha, minVar = m->minVariance;
  const __m128 va = _mm_set1_ps(alpha), vmin = _mm_set1_ps(minVar);
  for (int y = 0; y < roi.height; ++y) {
    const Zel8u* s = src + int64_t(y) * srcStep;
    float* mean = p.mean + y * n;
    float* var = p.var + y * n;
    int64_t e = 0;
    for (; e + 4 <= n; e += 4) {
      const __m128 mu = _mm_loadu_ps(mean + e), v = _mm_loadu_ps(var + e);
      const __m128 d = _mm_sub_ps(load4(s + e), mu);
      _mm_storeu_ps(mean + e, _mm_add_ps(mu, _mm_mul_ps(va, d)));
      const __m128 nv = _mm_add_ps(v, _mm_mul_ps(va, _mm_sub_ps(_mm_mul_ps(d, d), v)));
      _mm_storeu_ps(var + e, _mm_max_ps(nv, vmin));
    }
    for (; e < n; ++e) {
      const float d = float(s[e]) - mean[e];
      mean[e] = mean[e] + alpha * d;
      const float nv = var[e] + alpha * (d * d - var[e]);
      var[e] = nv > minVar ? nv : minVar;
    }
  }
  return zelStatusOk;
}

}  // namespace
}  // namespace background
}  // namespace zelcv

using namespace zelcv::background;

#define HISTOGRAM_ENTRIES(c)                                                                                   \
  ZELCV_ENTRY(zeliForegroundHistogramInitAlloc_8u_C##c##R)(const Zel8u* src, int srcStep, ZeliSize roiSize,  \
                                                           ZeliFGHistogramState** state,                      \
                                                           const ZeliFGHistogramParams* params) {             \
    return histogramInit(src, srcStep, roiSize, state, params, c);                                           \
  }                                                                                                          \
  ZELCV_ENTRY(zeliForegroundHistogram_8u_C##c##R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,    \
                                                  ZeliSize roiSize, const ZeliFGHistogramState* state) {     \
    return histogramDetect(src, srcStep, dst, dstStep, roiSize, state, c);                                    \
  }                                                                                                          \
  ZELCV_ENTRY(zeliForegroundHistogramUpdate_8u_C##c##R)(const Zel8u* src, int srcStep, ZeliSize roiSize,     \
                                                        ZeliFGHistogramState* state) {                       \
    return histogramUpdate(src, srcStep, roiSize, state, c);                                                  \
  }                                                                                                          \
  ZELCV_ENTRY(zeliForegroundGaussianInitAlloc_8u_C##c##R)(const Zel8u* src, int srcStep, ZeliSize roiSize,   \
                                                          ZeliFGGaussianState** state,                        \
                                                          const ZeliFGGaussianParams* params) {               \
    return gaussianInit(src, srcStep, roiSize, state, params, c);                                            \
  }                                                                                                          \
  ZELCV_ENTRY(zeliForegroundGaussian_8u_C##c##R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,     \
                                                 ZeliSize roiSize, const ZeliFGGaussianState* state) {       \
    return gaussianDetect(src, srcStep, dst, dstStep, roiSize, state, c);                                     \
  }                                                                                                          \
  ZELCV_ENTRY(zeliForegroundGaussianUpdate_8u_C##c##R)(const Zel8u* src, int srcStep, ZeliSize roiSize,      \
                                                       ZeliFGGaussianState* state) {                         \
    return gaussianUpdate(src, srcStep, roiSize, state, c);                                                   \
  }

HISTOGRAM_ENTRIES(1)
HISTOGRAM_ENTRIES(3)
