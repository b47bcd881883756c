// Pyramid layer states and the layer operations: a symmetric normalised
// kernel in both directions, then linear resampling by the state's rate.
// Only the filtered samples that the resampling reads are computed: the
// needed source columns are listed once per call, and each needed filtered
// row is formed from a ring of horizontally filtered rows.
#include <emmintrin.h>
#include <limits.h>
#include <string.h>

#include <limits>
#include <type_traits>

#include "core/alloc.h"
#include "core/status.h"
#include "filter/border.h"
#include "filter/pyramid_gauss.h"
#include "filter/pyramid_layer_kernels.h"
#include "filter/pyramid_sizes.h"

// The state: one block holding this head, the taps, the chain of level sizes
// and work memory for sources up to the base width.
struct ZeliPyramidLayerState {
  int32_t id;
  int32_t dataType;
  int32_t channels;
  float rate;
  int32_t kerSize;
  ZeliSize base;
  int32_t chainLength;
  float* taps;        // kerSize taps, already symmetric
  ZeliSize* chain;    // chainLength sizes, chain[0] = base
  float* ring;        // kerSize horizontally filtered rows
  float* filtered[2]; // two filtered rows
  int32_t* columns;   // needed source columns
  int32_t* pick;      // per destination column: two indices into the needed columns
                      // (2 x base width entries)
  float* frac;        // per destination column: the weight of the second
  size_t rowFloats;   // floats per work row: base width x channels
};

namespace zelcv {
namespace {

constexpr int32_t kLayerDownId = 0x50594C44;  // "PYLD"
constexpr int32_t kLayerUpId = 0x50594C55;    // "PYLU"

template <typename T>
constexpr ZelDataType codeOf() {
  return std::is_same<T, Zel8u>::value ? zel8u : std::is_same<T, Zel16u>::value ? zel16u : zel32f;
}

constexpr int64_t alignFloats(int64_t bytes) { return (bytes + 15) & ~int64_t(15); }

bool nearTwo(float rate) { return rate >= 2.0f - 0.00002f && rate <= 2.0f + 0.00002f; }

// Normalised taps as floats: fixed point for the integer types (exact in
// single precision), a plain quotient for 32f.
template <typename Tap>
void normaliseTaps(const Tap* kernel, int kerSize, ZelDataType type, float* taps) {
  const int r = kerSize / 2;
  if constexpr (std::is_same<Tap, Zel32f>::value) {
    float sum = 0.0f;
    for (int k = 0; k < kerSize; ++k) sum += kernel[k];
    if (sum == 0.0f) sum = 1.0f;
    for (int k = 0; k <= r; ++k) taps[k] = taps[kerSize - 1 - k] = kernel[k] / sum;
  } else {
    int64_t sum = 0;
    for (int k = 0; k < kerSize; ++k) sum += kernel[k];
    if (sum == 0) sum = 1;
    const int shift = type == zel8u ? 1 : 2;
    const float unit = type == zel8u ? 1.0f / 8192.0f : 1.0f / 4096.0f;
    for (int k = 0; k <= r; ++k) {
      const int64_t t = (int64_t(kernel[k]) * 16384 / sum) >> shift;
      taps[k] = taps[kerSize - 1 - k] = float(t) * unit;
    }
  }
}

template <typename T, typename Tap>
ZelStatus initLayer(ZeliPyramidLayerState** state, ZeliSize srcRoi, Zel32f rate, const Tap* kernel, int kerSize,
                    int mode, int channels, int32_t id) {
  if (!state || !kernel) return zelStatusNullPointer;
  if (ZelStatus s = checkSize(srcRoi)) return s;
  if (mode != 2) return zelStatusBadArgument;
  if (!pyr::rateValid(rate) || kerSize < 3 || kerSize % 2 == 0) return zelStatusBadArgument;
  if (channels != 1 && channels != 3) return zelStatusBadChannels;
  // Memory first, so that an impossible size fails before the chain is walked.
  const int64_t rowFloats = int64_t(srcRoi.width) * channels;
  const int64_t w = srcRoi.width;
  int64_t total = alignFloats(sizeof(ZeliPyramidLayerState)) + alignFloats(4 * int64_t(kerSize)) +
                  alignFloats(4 * rowFloats) * (int64_t(kerSize) + 2) + 4 * alignFloats(4 * w);
  if (total > INT_MAX) return zelStatusOutOfMemory;
  const int64_t chainLength = pyr::levelCount(srcRoi, rate, INT_MAX) + 1;
  total += alignFloats(int64_t(sizeof(ZeliSize)) * chainLength);
  uint8_t* block = total > INT_MAX ? nullptr : static_cast<uint8_t*>(allocBytes(int(total)));
  if (!block) return zelStatusOutOfMemory;
  ZeliPyramidLayerState* st = reinterpret_cast<ZeliPyramidLayerState*>(block);
  uint8_t* p = block + alignFloats(sizeof(ZeliPyramidLayerState));
  auto take = [&p](int64_t bytes) {
    uint8_t* at = p;
    p += alignFloats(bytes);
    return at;
  };
  st->id = id;
  st->dataType = codeOf<T>();
  st->channels = channels;
  st->rate = rate;
  st->kerSize = kerSize;
  st->base = srcRoi;
  st->chainLength = int32_t(chainLength);
  st->rowFloats = size_t(rowFloats);
  st->taps = reinterpret_cast<float*>(take(4 * int64_t(kerSize)));
  st->ring = reinterpret_cast<float*>(take(4 * rowFloats * kerSize));
  st->filtered[0] = reinterpret_cast<float*>(take(4 * rowFloats));
  st->filtered[1] = reinterpret_cast<float*>(take(4 * rowFloats));
  st->columns = reinterpret_cast<int32_t*>(take(4 * w));
  st->pick = reinterpret_cast<int32_t*>(take(8 * w));
  st->frac = reinterpret_cast<float*>(take(4 * w));
  st->chain = reinterpret_cast<ZeliSize*>(take(int64_t(sizeof(ZeliSize)) * chainLength));
  normaliseTaps(kernel, kerSize, codeOf<T>(), st->taps);
  st->chain[0] = srcRoi;
  for (int64_t i = 1; i < chainLength; ++i) st->chain[i] = pyr::downSize(st->chain[i - 1], rate);
  *state = st;
  return zelStatusOk;
}

// Where destination index x reads along an axis of n filtered samples.
struct Sample {
  int first, second;
  float weight;
};
inline Sample samplePosition(int x, int n, float rate, bool down) {
  if (down && nearTwo(rate)) {
    const int i = 2 * x < n - 1 ? 2 * x : n - 1;
    return {i, i, 0.0f};
  }
  float p = down ? float(x) * rate : float(x) / rate;
  if (p > float(n - 1)) p = float(n - 1);
  const int i = int(p);
  return {i, i + 1 < n ? i + 1 : n - 1, p - float(i)};
}

template <typename T>
inline T convert(float v) {
  if constexpr (std::is_same<T, float>::value) {
    return v;
  } else {
    constexpr float kMax = float(std::numeric_limits<T>::max());
    const float t = v + 0.5f;
    if (!(t > 0.0f)) return T(0);
    return t >= kMax ? T(kMax) : T(int(t));
  }
}

// Resamples src (srcRoi) into dst (dstRoi); pick, frac and columns hold
// dstRoi.width entries (columns at most srcRoi.width).
// The 8u taps as integers (in units of 1/8192) when the integer sums of a
// row equal its float sums: every tap a 16-bit integer, and no partial sum of
// 8-bit pixels reaching 2^24 units, below which floats add integers exactly.
bool integerTaps(const float* taps, int K, int16_t* itaps) {
  if (K > 63) return false;
  double bound = 0.0;
  for (int k = 0; k < K; ++k) {
    const double t = double(taps[k]) * 8192.0;
    if (t < -32768.0 || t > 32767.0 || t != double(int32_t(t))) return false;
    itaps[k] = int16_t(t);
    bound += (t < 0 ? -t : t) * 255.0;
  }
  itaps[K] = 0;
  return bound < 16777216.0;
}

template <typename T, int kCh>
void resample(const T* src, int srcStep, ZeliSize srcRoi, T* dst, int dstStep, ZeliSize dstRoi,
              ZeliPyramidLayerState* st, bool down, int32_t* pick, float* frac) {
  const int K = st->kerSize, R = K / 2, w = srcRoi.width, h = srcRoi.height;
  const float* taps = st->taps;
  const bool exact = down && nearTwo(st->rate);
  const layer::Kernels kernels = layer::chosenKernels();
  int16_t itaps[64];
  const bool integer = std::is_same<T, uint8_t>::value && kCh == 1 && exact && integerTaps(taps, K, itaps);
  // Needed source columns, ascending; each destination column's two picks.
  int32_t* cols = st->columns;
  int m = 0;
  // Positions never decrease, and a first pick is at most one column before
  // the last listed: look back, or append.
  auto indexOf = [&](int c) {
    int j = m - 1;
    while (j >= 0 && cols[j] > c) --j;
    if (j >= 0 && cols[j] == c) return j;
    cols[m] = c;
    return m++;
  };
  for (int x = 0; x < dstRoi.width; ++x) {
    const Sample s = samplePosition(x, w, st->rate, down);
    pick[2 * x] = indexOf(s.first);
    pick[2 * x + 1] = indexOf(s.second);
    frac[x] = s.weight;
  }
  const int n = m * kCh;
  int ringTag[64];
  int* tags = K <= 64 ? ringTag : nullptr;  // beyond 64 taps the ring is refilled
  if (tags)
    for (int k = 0; k < K; ++k) tags[k] = -1;
  auto srcRow = [&](int y) {
    return reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(src) + ptrdiff_t(srcStep) * y);
  };
  // Row y filtered horizontally at the needed columns.
  auto hrow = [&](int y, int slot) {
    float* out = st->ring + st->rowFloats * size_t(slot);
    if (tags && tags[slot] == y) return out;
    const T* s = srcRow(y);
    // Columns whose taps all lie inside the row read it directly; the rest
    // go through the border rule.
    auto edgeColumn = [&](int j) {
      const int c0 = cols[j] - R;
      for (int c = 0; c < kCh; ++c) {
        float acc = taps[0] * float(s[borderIndex(c0, w, zelBorderMirror) * kCh + c]);
        for (int k = 1; k < K; ++k) acc += taps[k] * float(s[borderIndex(c0 + k, w, zelBorderMirror) * kCh + c]);
        out[j * kCh + c] = acc;
      }
    };
    int lo = 0, hi = m;
    while (lo < m && cols[lo] - R < 0) edgeColumn(lo++);
    while (hi > lo && cols[hi - 1] + R > w - 1) edgeColumn(--hi);
    if (exact && kCh == 1) {
      // Every second column. 8u: eight columns per step from the even bytes
      // of one load per tap; the sum of each column in tap order throughout.
      const int start = cols[lo] - R;
      int j = lo;
      if constexpr (std::is_same<T, uint8_t>::value) {
        if (integer) {
          j += kernels.evenColumns8u(reinterpret_cast<const uint8_t*>(s) + start, w - start, itaps, K, hi - lo,
                                     1.0f / 8192.0f, out + lo);
        } else {
          for (; j + 8 <= hi && start + 2 * (j - lo) + K + 15 <= w; j += 8) {
            const T* q = s + start + 2 * (j - lo);
            __m128 acc0 = _mm_setzero_ps(), acc1 = _mm_setzero_ps();
            for (int k = 0; k < K; ++k) {
              const __m128i even =
                  _mm_and_si128(_mm_loadu_si128(reinterpret_cast<const __m128i*>(q + k)), _mm_set1_epi16(0xFF));
              const __m128 t = _mm_set1_ps(taps[k]);
              const __m128 lo4 = _mm_mul_ps(t, _mm_cvtepi32_ps(_mm_unpacklo_epi16(even, _mm_setzero_si128())));
              const __m128 hi4 = _mm_mul_ps(t, _mm_cvtepi32_ps(_mm_unpackhi_epi16(even, _mm_setzero_si128())));
              acc0 = k == 0 ? lo4 : _mm_add_ps(acc0, lo4);
              acc1 = k == 0 ? hi4 : _mm_add_ps(acc1, hi4);
            }
            _mm_storeu_ps(out + j, acc0);
            _mm_storeu_ps(out + j + 4, acc1);
          }
        }
      }
      for (; j < hi; ++j) {
        const T* q = s + start + 2 * (j - lo);
        float acc = taps[0] * float(q[0]);
        for (int k = 1; k < K; ++k) acc += taps[k] * float(q[k]);
        out[j] = acc;
      }
    } else {
      for (int j = lo; j < hi; ++j) {
        const T* p = s + (cols[j] - R) * kCh;
        for (int c = 0; c < kCh; ++c) {
          float acc = taps[0] * float(p[c]);
          for (int k = 1; k < K; ++k) acc += taps[k] * float(p[k * kCh + c]);
          out[j * kCh + c] = acc;
        }
      }
    }
    if (tags) tags[slot] = y;
    return out;
  };
  int filteredTag[2] = {-1, -1};
  // Filtered row y at the needed columns.
  auto frow = [&](int y) {
    const int slot = y & 1;
    float* out = st->filtered[slot];
    if (filteredTag[slot] == y) return static_cast<const float*>(out);
    if (K <= 64) {
      const float* rows[64];
      for (int k = 0; k < K; ++k) {
        const int r = borderIndex(y - R + k, h, zelBorderMirror);
        rows[k] = hrow(r, r % K);
      }
      kernels.weightedRows(rows, taps, K, n, out);
    } else {
      // Long kernels: one ring row at a time, in tap order.
      for (int k = 0; k < K; ++k) {
        const int r = borderIndex(y - R + k, h, zelBorderMirror);
        const float* hr = hrow(r, 0);
        for (int i = 0; i < n; ++i) out[i] = k == 0 ? taps[0] * hr[i] : out[i] + taps[k] * hr[i];
      }
    }
    filteredTag[slot] = y;
    return static_cast<const float*>(out);
  };
  for (int y = 0; y < dstRoi.height; ++y) {
    T* d = reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(dst) + ptrdiff_t(dstStep) * y);
    const Sample sy = samplePosition(y, h, st->rate, down);
    const float* f0 = frow(sy.first);
    if (exact) {
      int x = 0;
      if constexpr (std::is_same<T, uint8_t>::value && kCh == 1) {
        // Columns read in order (all but clamped ones at the end) convert
        // as a block.
        int plain = dstRoi.width;
        while (plain > 0 && pick[2 * (plain - 1)] != plain - 1) --plain;
        kernels.floatsToBytes(f0, plain, d);
        x = plain;
      }
      for (; x < dstRoi.width; ++x)
        for (int c = 0; c < kCh; ++c) d[x * kCh + c] = convert<T>(f0[pick[2 * x] * kCh + c]);
      continue;
    }
    const float* f1 = frow(sy.second);
    for (int x = 0; x < dstRoi.width; ++x) {
      const int a = pick[2 * x] * kCh, b = pick[2 * x + 1] * kCh;
      const float fx = frac[x];
      for (int c = 0; c < kCh; ++c) {
        const float v0 = f0[a + c] + (f0[b + c] - f0[a + c]) * fx;
        const float v1 = f1[a + c] + (f1[b + c] - f1[a + c]) * fx;
        d[x * kCh + c] = convert<T>(v0 + (v1 - v0) * sy.weight);
      }
    }
  }
}

// The binomial five taps at rate 2 on 8u, with the destination that halving
// gives: every product and partial sum of the float path is then a small
// multiple of 2^-8, so exact, and its result is (sum + 128) >> 8 of the
// binomial weights over mirrored pixels -- the 5x5 Gaussian reduction, whose
// integer kernels this runs. Images below three rows or columns, which that
// reduction treats apart, stay on the general path.
template <typename T, int kCh>
bool binomialHalving(const T* src, int srcStep, ZeliSize srcRoi, T* dst, int dstStep, ZeliSize dstRoi,
                     ZeliPyramidLayerState* st) {
  if constexpr (!std::is_same<T, uint8_t>::value) {
    return false;
  } else {
    static const float kBinomial[5] = {1.0f / 16, 4.0f / 16, 6.0f / 16, 4.0f / 16, 1.0f / 16};
    if (st->kerSize != 5 || !nearTwo(st->rate) || memcmp(st->taps, kBinomial, sizeof kBinomial) != 0) return false;
    if (srcRoi.width < 3 || srcRoi.height < 3 || dstRoi.width != (srcRoi.width + 1) / 2 ||
        dstRoi.height != (srcRoi.height + 1) / 2)
      return false;
    // The reduction's six intermediate rows, in the state's work rows.
    uint8_t* work = reinterpret_cast<uint8_t*>(st->ring);
    const size_t need = 64 + 6 * pyr::downRowBytes(srcRoi.width, kCh);
    if (size_t(reinterpret_cast<uint8_t*>(st->chain) - work) < need) return false;
    pyr::pyrDown<T, kCh>(src, srcStep, dst, dstStep, srcRoi, work);
    return true;
  }
}

template <typename T, int kCh>
ZelStatus runLayer(const T* src, int srcStep, ZeliSize srcRoi, T* dst, int dstStep, ZeliSize dstRoi,
                   ZeliPyramidLayerState* st, bool down) {
  if (ZelStatus s = checkPointers({src, dst, st})) return s;
  if (ZelStatus s = checkSize(srcRoi)) return s;
  const ImageArg in = image(src, srcStep, kCh), out = image(dst, dstStep, kCh);
  if (srcStep <= 0 || srcStep < in.rowBytes(srcRoi.width) || dstStep <= 0 || dstStep < out.rowBytes(dstRoi.width))
    return zelStatusBadStep;
  if ((srcStep | dstStep) & in.alignMask) return zelStatusMisalignedStep;
  if (st->id != (down ? kLayerDownId : kLayerUpId)) return zelStatusBadContext;
  if (!pyr::rateValid(st->rate)) return zelStatusBadArgument;
  if (st->dataType != codeOf<T>()) return zelStatusBadDataType;
  if (st->channels != kCh) return zelStatusBadChannels;
  if (down) {
    ZeliSize want = pyr::downSize(srcRoi, st->rate);
    for (int i = 0; i + 1 < st->chainLength; ++i)
      if (st->chain[i].height == srcRoi.height) {
        want = st->chain[i + 1];
        break;
      }
    if (dstRoi.width != want.width || dstRoi.height != want.height) return zelStatusBadSize;
  } else {
    auto inRange = [&](int d, int n) { return d >= pyr::upMin(n, st->rate) && d <= pyr::upMax(n, st->rate); };
    if (!inRange(dstRoi.width, srcRoi.width) || !inRange(dstRoi.height, srcRoi.height)) return zelStatusBadSize;
  }
  if (srcRoi.width > st->base.width) return zelStatusBadSize;
  if (down) {
    if (binomialHalving<T, kCh>(src, srcStep, srcRoi, dst, dstStep, dstRoi, st)) return zelStatusOk;
    resample<T, kCh>(src, srcStep, srcRoi, dst, dstStep, dstRoi, st, true, st->pick, st->frac);
    return zelStatusOk;
  }
  // The destination of an expansion is wider than the state's tables.
  const int64_t words = 3 * int64_t(dstRoi.width);
  uint8_t* tables = words > INT_MAX / 4 ? nullptr : static_cast<uint8_t*>(alloc32(int(words)));
  if (!tables) return zelStatusOutOfMemory;
  resample<T, kCh>(src, srcStep, srcRoi, dst, dstStep, dstRoi, st, false, reinterpret_cast<int32_t*>(tables),
                   reinterpret_cast<float*>(tables + 8 * size_t(dstRoi.width)));
  release(tables);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

#define ZELCV_LAYER_ENTRIES(suffix, T, Tap, ch)                                                                 \
  ZELCV_ENTRY(zeliPyramidLayerDownInitAlloc_##suffix)(ZeliPyramidLayerState * *state, ZeliSize srcRoi,         \
                                                      Zel32f rate, const Tap* kernel, int kerSize, int mode) {  \
    return zelcv::initLayer<T>(state, srcRoi, rate, kernel, kerSize, mode, ch, zelcv::kLayerDownId);           \
  }                                                                                                             \
  ZELCV_ENTRY(zeliPyramidLayerUpInitAlloc_##suffix)(ZeliPyramidLayerState * *state, ZeliSize srcRoi,           \
                                                    Zel32f rate, const Tap* kernel, int kerSize, int mode) {    \
    return zelcv::initLayer<T>(state, srcRoi, rate, kernel, kerSize, mode, ch, zelcv::kLayerUpId);             \
  }                                                                                                             \
  ZELCV_ENTRY(zeliPyramidLayerDown_##suffix)(const T* src, int srcStep, ZeliSize srcRoi, T* dst, int dstStep,  \
                                             ZeliSize dstRoi, ZeliPyramidLayerState* state) {                   \
    return zelcv::runLayer<T, ch>(src, srcStep, srcRoi, dst, dstStep, dstRoi, state, true);                    \
  }                                                                                                             \
  ZELCV_ENTRY(zeliPyramidLayerUp_##suffix)(const T* src, int srcStep, ZeliSize srcRoi, T* dst, int dstStep,    \
                                           ZeliSize dstRoi, ZeliPyramidLayerState* state) {                     \
    return zelcv::runLayer<T, ch>(src, srcStep, srcRoi, dst, dstStep, dstRoi, state, false);                   \
  }
ZELCV_LAYER_ENTRIES(8u_C1R, Zel8u, Zel16s, 1)
ZELCV_LAYER_ENTRIES(8u_C3R, Zel8u, Zel16s, 3)
ZELCV_LAYER_ENTRIES(16u_C1R, Zel16u, Zel16s, 1)
ZELCV_LAYER_ENTRIES(16u_C3R, Zel16u, Zel16s, 3)
ZELCV_LAYER_ENTRIES(32f_C1R, Zel32f, Zel32f, 1)
ZELCV_LAYER_ENTRIES(32f_C3R, Zel32f, Zel32f, 3)
#undef ZELCV_LAYER_ENTRIES
