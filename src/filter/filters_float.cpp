// The floating-point engine of the derivative and smoothing filters: the
// 32f Sobel, Scharr, Laplacian, lowpass and fixed Gaussian members, and the
// Gaussian filter with a caller's taps for 8u, 16u and 32f images. Each
// output row is a sum of separable terms, each computed with the separable
// pipeline's own span kernels:
//   row pass    h = the row taps over the extended source row, products and
//               sum in double (tap 0 first), rounded once to single precision;
//   column pass the column taps over K rows of h, in single precision (tap 0
//               first, a multiplication then an addition per tap).
// Those kernels give the same bits on every instruction set, so the results
// here do too. Integer sources are converted to float exactly; integer
// results are rounded to nearest (ties to even) and saturated.
#include <emmintrin.h>
#include <limits.h>
#include <string.h>

#include <cmath>
#include <type_traits>

#include "core/alloc.h"
#include "core/status.h"
#include "filter/border.h"
#include "filter/derivative.h"
#include "filter/filters_common.h"
#include "filter/sepfilter_kernels.h"
#include "zelcv/filters.h"

namespace zelcv {
namespace {

// One separable term: K taps along the row and K taps down the columns.
struct Term {
  const float* rowTaps;
  const float* colTaps;
};

constexpr int kMaxTerms = 2;

// A source image as the engine sees it, with its vertical border rule.
template <typename S>
struct FloatSource {
  const S* src;
  int srcStep;
  ZeliSize roi;
  int channels;
  ZeliBorderType border;
  const S* value;  // one per channel

  // The row that stands for row y, or null for a row of border values.
  const S* row(int y) const {
    if (y < 0 ? inMemoryTop(border) : y >= roi.height ? inMemoryBottom(border) : true)
      return reinterpret_cast<const S*>(reinterpret_cast<const uint8_t*>(src) + ptrdiff_t(y) * srcStep);
    const int kind = borderKind(border);
    if (kind == zelBorderConstant) return nullptr;
    int index = borderIndex(y, roi.height, kind);
    index = index < 0 ? 0 : index >= roi.height ? roi.height - 1 : index;
    return reinterpret_cast<const S*>(reinterpret_cast<const uint8_t*>(src) + ptrdiff_t(index) * srcStep);
  }
};

// The parts of the work buffer, each 16-byte aligned; floatBufferBytes
// covers them.
template <typename S>
struct FloatWork {
  __m128d* taps;  // terms x K prepared row taps
  float* ext;     // (width + K - 1) x channels
  S* ends;        // 2 r x channels border pixels of the source type
  float* ring;    // terms x K rows of width x channels
  float* result;  // width x channels
  const float** rows;  // terms x K column pointers
  FloatWork(Zel8u* buffer, int width, int k, int channels, int terms) {
    const size_t n = size_t(width) * channels;
    uint8_t* p = alignUp(buffer, 16);
    taps = reinterpret_cast<__m128d*>(p);
    p = alignUp(p + sizeof(__m128d) * size_t(terms) * k, 16);
    rows = reinterpret_cast<const float**>(p);
    p = alignUp(p + sizeof(float*) * size_t(terms) * k, 16);
    ext = reinterpret_cast<float*>(p);
    p = alignUp(p + sizeof(float) * (size_t(width) + k - 1) * channels, 16);
    ends = reinterpret_cast<S*>(p);
    p = alignUp(p + sizeof(S) * size_t(k - 1) * channels, 16);
    ring = reinterpret_cast<float*>(p);
    p = alignUp(p + sizeof(float) * n * k * terms, 16);
    result = reinterpret_cast<float*>(p);
  }
};

// Rounds to nearest even and saturates: the clamp first, in float, as the
// pipeline's integer results do.
template <typename D>
void convertRow(const float* in, D* out, int n) {
  constexpr float lo = std::is_same<D, Zel8u>::value ? 0.0f : 0.0f;
  constexpr float hi = std::is_same<D, Zel8u>::value ? 255.0f : 65535.0f;
  int i = 0;
  for (; i + 8 <= n; i += 8) {
    __m128 a = _mm_min_ps(_mm_max_ps(_mm_loadu_ps(in + i), _mm_set1_ps(lo)), _mm_set1_ps(hi));
    __m128 b = _mm_min_ps(_mm_max_ps(_mm_loadu_ps(in + i + 4), _mm_set1_ps(lo)), _mm_set1_ps(hi));
    __m128i ia = _mm_cvtps_epi32(a), ib = _mm_cvtps_epi32(b);
    if constexpr (std::is_same<D, Zel8u>::value) {
      const __m128i w = _mm_packs_epi32(ia, ib);
      _mm_storel_epi64(reinterpret_cast<__m128i*>(out + i), _mm_packus_epi16(w, w));
    } else {
      const __m128i bias = _mm_set1_epi32(32768);
      const __m128i w = _mm_packs_epi32(_mm_sub_epi32(ia, bias), _mm_sub_epi32(ib, bias));
      _mm_storeu_si128(reinterpret_cast<__m128i*>(out + i), _mm_xor_si128(w, _mm_set1_epi16(short(0x8000))));
    }
  }
  for (; i < n; ++i) out[i] = D(_mm_cvtss_si32(_mm_set_ss(sep::clampLikeVector(in[i], lo, hi))));
}

// Runs `terms` over the image; D is the result type (float, or 8u/16u
// through the result row).
template <typename S, typename D>
void runFloat(const FloatSource<S>& source, D* dst, int dstStep, const Term* terms, int nTerms, int k, Zel8u* buffer) {
  const int width = source.roi.width, ch = source.channels, r = k / 2;
  const size_t n = size_t(width) * ch;
  const FloatWork<S> work(buffer, width, k, ch, nTerms);
  for (int t = 0; t < nTerms; ++t)
    for (int j = 0; j < k; ++j) work.taps[t * k + j] = _mm_set1_pd(double(terms[t].rowTaps[j]));
  auto ringRow = [&](int t, int y) { return work.ring + (size_t(t) * k + size_t(((y % k) + k) % k)) * n; };

  // Row pass of source row y into every term's ring.
  auto rowPass = [&](int y) {
    const S* p = source.row(y);
    float* ext = work.ext;
    if constexpr (std::is_same<S, float>::value) {
      // Float rows are read in place; only the two ends are built, each from
      // its border pixels and the K - 1 row pixels next to them. Every output
      // depends on its own window only, so the three spans give the bits of
      // one span over the whole extended row.
      if (p && width >= 2 * (k - 1)) {  // both ends fit the extended-row buffer
        const size_t endPixels = size_t(k - 1) * ch;
        float* right = ext + size_t(r) * ch + endPixels;
        extendRowBorder<S>(p, width, ch, source.border, source.value, r, r, ext, right + endPixels);
        memcpy(ext + size_t(r) * ch, p, endPixels * sizeof(float));
        memcpy(right, p + n - endPixels, endPixels * sizeof(float));
        for (int t = 0; t < nTerms; ++t) {
          float* out = ringRow(t, y);
          const sep::PreparedTaps<double> taps{work.taps + t * k};
          sep::filterSpanAnySize(sep::DoubleSum{}, sep::RowSource<float>{ext, ch}, out, r * ch, taps, k);
          sep::filterSpanAnySize(sep::DoubleSum{}, sep::RowSource<float>{p, ch}, out + size_t(r) * ch,
                                 (width - k + 1) * ch, taps, k);
          sep::filterSpanAnySize(sep::DoubleSum{}, sep::RowSource<float>{right, ch},
                                 out + size_t(width - r) * ch, r * ch, taps, k);
        }
        return;
      }
    }
    if (!p) {
      for (size_t i = 0; i < (size_t(width) + k - 1) * ch; ++i) ext[i] = float(source.value[i % ch]);
    } else {
      for (size_t i = 0; i < n; ++i) ext[size_t(r) * ch + i] = float(p[i]);
      S* left = work.ends;
      S* right = work.ends + size_t(r) * ch;
      extendRowBorder<S>(p, width, ch, source.border, source.value, r, r, left, right);
      for (int i = 0; i < r * ch; ++i) {
        ext[i] = float(left[i]);
        ext[(size_t(r) + width) * ch + i] = float(right[i]);
      }
    }
    for (int t = 0; t < nTerms; ++t)
      sep::filterSpanAnySize(sep::DoubleSum{}, sep::RowSource<float>{ext, ch}, ringRow(t, y), int(n),
                             sep::PreparedTaps<double>{work.taps + t * k}, k);
  };

  for (int y = -r; y < r; ++y) rowPass(y);
  for (int y = 0; y < source.roi.height; ++y) {
    rowPass(y + r);
    D* out = reinterpret_cast<D*>(reinterpret_cast<uint8_t*>(dst) + ptrdiff_t(y) * dstStep);
    float* first;
    if constexpr (std::is_same<D, float>::value)
      first = out;
    else
      first = work.result;
    for (int t = 0; t < nTerms; ++t) {
      float* target = t == 0 ? first : work.result;
      // Column pointers in tap order: rows y - r .. y + r.
      const float** col = work.rows + size_t(t) * k;
      for (int j = 0; j < k; ++j) col[j] = ringRow(t, y - r + j);
      sep::filterSpanAnySize(sep::SingleSum{}, sep::ColumnSource<float>{col}, target, int(n),
                             sep::ComputedTaps<float>{terms[t].colTaps, 1.0f}, k);
      if (t > 0)
        for (size_t i = 0; i < n; ++i) first[i] += work.result[i];
    }
    if constexpr (!std::is_same<D, float>::value) convertRow(work.result, out, int(n));
  }
}

// ---- the fixed 32f members ---------------------------------------------------

const float kSmooth3[] = {1, 2, 1};
const float kSmooth5[] = {1, 4, 6, 4, 1};
const float kScharr3[] = {3, 10, 3};
const float kFirst3[] = {-1, 0, 1};
const float kFirst5[] = {-1, -2, 0, 2, 1};
const float kNegFirst3[] = {1, 0, -1};
const float kNegFirst5[] = {1, 2, 0, -2, -1};
const float kSecond3[] = {1, -2, 1};
const float kSecond5[] = {1, 0, -2, 0, 1};
const float kOne3[] = {1, 1, 1};
const float kOne5[] = {1, 1, 1, 1, 1};
const float kNinth[] = {1.0f / 9, 1.0f / 9, 1.0f / 9};
const float kTwentyFifth[] = {1.0f / 25, 1.0f / 25, 1.0f / 25, 1.0f / 25, 1.0f / 25};
const float kGauss3[] = {0.25f, 0.5f, 0.25f};
const float kGauss5[] = {0.0625f, 0.25f, 0.375f, 0.25f, 0.0625f};

// An operation's terms for the 3x3 and the 5x5 mask ({} where it has none).
struct FixedKernel {
  Term t3[kMaxTerms];
  int n3;
  Term t5[kMaxTerms];
  int n5;
};

const FixedKernel kNegVert = {{{kNegFirst3, kSmooth3}}, 1, {{kNegFirst5, kSmooth5}}, 1};
const FixedKernel kHorizSecond = {{{kSmooth3, kSecond3}}, 1, {{kSmooth5, kSecond5}}, 1};
const FixedKernel kVertSecond = {{{kSecond3, kSmooth3}}, 1, {{kSecond5, kSmooth5}}, 1};
const FixedKernel kCross = {{{kFirst3, kFirst3}}, 1, {{kFirst5, kFirst5}}, 1};
const FixedKernel kScharrHoriz = {{{kScharr3, kFirst3}}, 1, {}, 0};
const FixedKernel kScharrVert = {{{kFirst3, kScharr3}}, 1, {}, 0};
const FixedKernel kLaplacian = {{{kSecond3, kSmooth3}, {kSmooth3, kSecond3}}, 2,
                                {{kSecond5, kSmooth5}, {kSmooth5, kSecond5}}, 2};
const FixedKernel kLowpass = {{{kOne3, kNinth}}, 1, {{kOne5, kTwentyFifth}}, 1};
const FixedKernel kGauss = {{{kGauss3, kGauss3}}, 1, {{kGauss5, kGauss5}}, 1};

ZelStatus fixed32f(const FixedKernel& kernel, const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                   ZeliSize roi, int mask, ZeliBorderType border, Zel32f borderValue, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep)}, roi, {buffer})) return s;
  if (ZelStatus s = filters::checkMask(mask, kernel.n5 > 0)) return s;
  if (ZelStatus s = filters::checkBorder(border)) return s;
  const int k = filters::maskTaps(mask);
  if (filters::floatBufferBytes(roi.width, k, 1, kMaxTerms) > INT_MAX) return zelStatusBadSize;
  const FloatSource<Zel32f> source{src, srcStep, roi, 1, border, &borderValue};
  if (k == 5)
    runFloat(source, dst, dstStep, kernel.t5, kernel.n5, k, buffer);
  else
    runFloat(source, dst, dstStep, kernel.t3, kernel.n3, k, buffer);
  return zelStatusOk;
}

ZelStatus floatQuery(ZeliSize roi, int mask, bool has5x5, int* bufferSize) {
  if (ZelStatus s = checkSizeQuery(roi, bufferSize)) return s;
  if (ZelStatus s = filters::checkMask(mask, has5x5)) return s;
  const int64_t bytes = filters::floatBufferBytes(roi.width, filters::maskTaps(mask), 1, kMaxTerms);
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

}  // namespace

int64_t scharr32fBufferBytes(int width) { return filters::floatBufferBytes(width, 3, 1, kMaxTerms); }

// ---- gradient rows of 32f images on the engine's arithmetic ---------------------
//
// The same row and column passes as runFloat, for callers that take one row
// at a time and have no room for the ring: each of the K row-pass results an
// output row needs is formed again, and the column taps are applied to it at
// once, in tap order, so the sums are those of the ring form term for term.

namespace {

struct GradientTaps {
  int k;
  const float* smooth;
  const float* first;
};

GradientTaps gradientTaps(DerivativeKernel kernel) {
  switch (kernel) {
    case DerivativeKernel::kScharr3x3: return {3, kScharr3, kFirst3};
    case DerivativeKernel::kSobel5x5: return {5, kSmooth5, kFirst5};
    default: return {3, kSmooth3, kFirst3};
  }
}

// acc = tap * h for the first column tap, then acc = acc + tap * h: the
// column pass's multiplication and addition, in the same order.
void columnStep(float* acc, const float* h, float tap, bool first, int n) {
  const __m128 t = _mm_set1_ps(tap);
  int i = 0;
  if (first) {
    for (; i + 4 <= n; i += 4) _mm_storeu_ps(acc + i, _mm_mul_ps(t, _mm_loadu_ps(h + i)));
    for (; i < n; ++i) acc[i] = tap * h[i];
  } else {
    for (; i + 4 <= n; i += 4)
      _mm_storeu_ps(acc + i, _mm_add_ps(_mm_loadu_ps(acc + i), _mm_mul_ps(t, _mm_loadu_ps(h + i))));
    for (; i < n; ++i) acc[i] = acc[i] + tap * h[i];
  }
}

}  // namespace

size_t DerivativeRows32f::scratchBytes(DerivativeKernel kernel, int width) {
  // The extended source row and one row-pass result, each 16-byte aligned.
  const size_t r = size_t(derivativeRadius(kernel));
  return (size_t(width) + 2 * r) * sizeof(float) + size_t(width) * sizeof(float) + 32;
}

DerivativeRows32f::DerivativeRows32f(const Zel32f* src, int srcStep, ZeliSize roi, DerivativeKernel kernel,
                                     ZeliBorderType border, Zel32f borderValue, void* scratch)
    : src_(src), srcStep_(srcStep), roi_(roi), kernel_(kernel), border_(border), borderValue_(borderValue) {
  ext_ = reinterpret_cast<Zel32f*>(alignUp(scratch, 16));
  rowSum_ = reinterpret_cast<Zel32f*>(alignUp(ext_ + size_t(roi.width) + 2 * size_t(derivativeRadius(kernel)), 16));
}

void DerivativeRows32f::row(int y, Zel32f* dx, Zel32f* dy) const {
  const GradientTaps taps = gradientTaps(kernel_);
  const int k = taps.k, r = k / 2, width = roi_.width;
  alignas(16) __m128d first[5], smooth[5];
  for (int j = 0; j < k; ++j) {
    first[j] = _mm_set1_pd(double(taps.first[j]));
    smooth[j] = _mm_set1_pd(double(taps.smooth[j]));
  }
  const FloatSource<Zel32f> source{src_, srcStep_, roi_, 1, border_, &borderValue_};
  for (int i = 0; i < k; ++i) {
    // Row y - r + i extended by its border, as the engine's row pass builds it.
    const Zel32f* p = source.row(y - r + i);
    if (!p) {
      for (int x = 0; x < width + 2 * r; ++x) ext_[x] = borderValue_;
    } else {
      memcpy(ext_ + r, p, size_t(width) * sizeof(float));
      extendRowBorder<Zel32f>(p, width, 1, border_, &borderValue_, r, r, ext_, ext_ + r + width);
    }
    // dx: derivative taps along the row, smoothing taps down the column;
    // dy the transpose.
    sep::filterSpanAnySize(sep::DoubleSum{}, sep::RowSource<float>{ext_, 1}, rowSum_, width,
                           sep::PreparedTaps<double>{first}, k);
    columnStep(dx, rowSum_, taps.smooth[i], i == 0, width);
    sep::filterSpanAnySize(sep::DoubleSum{}, sep::RowSource<float>{ext_, 1}, rowSum_, width,
                           sep::PreparedTaps<double>{smooth}, k);
    columnStep(dy, rowSum_, taps.first[i], i == 0, width);
  }
}

void scharr32f(const Zel32f* src, int srcStep, ZeliSize roi, ZeliBorderType border, Zel32f* dx, int dxStep,
               Zel32f* dy, int dyStep, Zel8u* buffer) {
  const Zel32f zero = 0.0f;
  const FloatSource<Zel32f> source{src, srcStep, roi, 1, border, &zero};
  runFloat(source, dx, dxStep, kScharrVert.t3, kScharrVert.n3, 3, buffer);
  runFloat(source, dy, dyStep, kScharrHoriz.t3, kScharrHoriz.n3, 3, buffer);
}

}  // namespace zelcv

using namespace zelcv;

#define ZELCV_FIXED32F(name, kernel)                                                                             \
  ZELCV_ENTRY(zeliFilter##name##Border_32f_C1R)(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,       \
                                                ZeliSize roiSize, int maskSize, ZeliBorderType borderType,      \
                                                Zel32f borderValue, Zel8u* buffer) {                            \
    return fixed32f(kernel, src, srcStep, dst, dstStep, roiSize, maskSize, borderType, borderValue, buffer);    \
  }

ZELCV_FIXED32F(SobelNegVert, kNegVert)
ZELCV_FIXED32F(SobelHorizSecond, kHorizSecond)
ZELCV_FIXED32F(SobelVertSecond, kVertSecond)
ZELCV_FIXED32F(SobelCross, kCross)
ZELCV_FIXED32F(ScharrHoriz, kScharrHoriz)
ZELCV_FIXED32F(ScharrVert, kScharrVert)
ZELCV_FIXED32F(Laplacian, kLaplacian)
ZELCV_FIXED32F(Lowpass, kLowpass)
ZELCV_FIXED32F(Gauss, kGauss)

ZELCV_SHARED_ENTRY(filterSobelBufferSize32f)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return floatQuery(roiSize, maskSize, true, bufferSize);
}
ZELCV_SHARED_ENTRY(filterScharrBufferSize32f)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return floatQuery(roiSize, maskSize, false, bufferSize);
}
ZELCV_ENTRY(zeliFilterLaplacianGetBufferSize_32f_C1R)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return floatQuery(roiSize, maskSize, true, bufferSize);
}
ZELCV_ENTRY(zeliFilterLowpassGetBufferSize_32f_C1R)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return floatQuery(roiSize, maskSize, true, bufferSize);
}
ZELCV_ENTRY(zeliFilterGaussGetBufferSize_32f_C1R)(ZeliSize roiSize, int maskSize, int* bufferSize) {
  return floatQuery(roiSize, maskSize, true, bufferSize);
}

// ---- the Gaussian filter with the caller's sigma and kernel size ---------------

namespace zelcv {
namespace {

constexpr uint32_t kGaussianId = 0x5A47534Eu;  // identifies an initialised state

// The record inside the caller's block, at its first 16-byte boundary.
struct GaussianState {
  uint32_t id;
  int32_t kernelSize;
  int32_t dataType;
  int32_t channels;
  int32_t maxWidth;
  int32_t reserved[3];
  // kernelSize taps follow
  float* taps() { return reinterpret_cast<float*>(this + 1); }
  const float* taps() const { return reinterpret_cast<const float*>(this + 1); }
};
static_assert(sizeof(GaussianState) == 32, "the state record is 32 bytes");

int64_t gaussianStateBytes(int64_t k) { return 4 * k + int64_t(sizeof(GaussianState)) + 16; }

// Symmetric taps that sum to one: the centre is 1 / sum, tap i (and its
// mirror) exp(-(x/2)^2 / (2 sigma^2)) / sum with x = 1 - K + 2i, in double,
// then rounded to float. Without a positive sigma, sigma = 0.15 K + 0.35
// and K = 3, 5, 7, 9 take fixed small-integer taps instead.
void gaussianTaps(int k, float sigma, float* taps) {
  static const float kFixed7[] = {2 / 64.0f, 7 / 64.0f, 14 / 64.0f, 18 / 64.0f, 14 / 64.0f, 7 / 64.0f, 2 / 64.0f};
  static const float kFixed9[] = {4 / 256.0f,  13 / 256.0f, 30 / 256.0f, 51 / 256.0f, 60 / 256.0f,
                                  51 / 256.0f, 30 / 256.0f, 13 / 256.0f, 4 / 256.0f};
  if (!(sigma > 0.0f) && k <= 9) {
    const float* table = k == 3 ? kGauss3 : k == 5 ? kGauss5 : k == 7 ? kFixed7 : kFixed9;
    for (int i = 0; i < k; ++i) taps[i] = table[i];
    return;
  }
  const double s = sigma > 0.0f ? double(sigma) : std::fma(double(k), 0.15, 0.35);
  const double scale = -0.125 / (s * s);
  const int half = (k - 1) / 2;
  double sum = 0.0;
  for (int i = 0, x = 1 - k; i < half; ++i, x += 2) sum += std::exp(double(x) * x * scale);
  sum = sum * 2.0 + 1.0;
  const double mul = 1.0 / sum;
  for (int i = 0, x = 1 - k; i < half; ++i, x += 2) taps[i] = taps[k - 1 - i] = float(std::exp(double(x) * x * scale) * mul);
  taps[half] = float(mul);
}

// The checks of the query and of Init, in their order.
ZelStatus checkGaussianArgs(ZeliSize roi, int kernelSize, int dataType, int channels) {
  if (ZelStatus s = checkSize(roi)) return s;
  if (dataType != zel8u && dataType != zel16u && dataType != zel32f) return zelStatusBadDataType;
  if (channels != 1 && channels != 3) return zelStatusChannelCountNotSupported;
  if (kernelSize < 3 || (kernelSize & 1) == 0) return zelStatusBadMaskSize;
  if (gaussianStateBytes(kernelSize) > INT_MAX ||
      filters::floatBufferBytes(roi.width, kernelSize, channels, 1) > INT_MAX)
    return zelStatusBadSize;
  return zelStatusOk;
}

template <typename T> struct TypeCode;
template <> struct TypeCode<Zel8u> { static constexpr int value = zel8u; };
template <> struct TypeCode<Zel16u> { static constexpr int value = zel16u; };
template <> struct TypeCode<Zel32f> { static constexpr int value = zel32f; };

template <typename T, int kChannels>
ZelStatus gaussian(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, ZeliBorderType border,
                   const T* borderValue, const ZeliFilterGaussianState* gaussian, Zel8u* buffer) {
  if (ZelStatus s = checkImages({image(src, srcStep, kChannels), image(dst, dstStep, kChannels)}, roi,
                                {gaussian, buffer, borderValue}))
    return s;
  if (ZelStatus s = filters::checkBorder(border)) return s;
  const auto* state = reinterpret_cast<const GaussianState*>(alignUp(const_cast<ZeliFilterGaussianState*>(gaussian), 16));
  if (state->id != kGaussianId) return zelStatusBadContext;
  if (state->dataType != TypeCode<T>::value) return zelStatusBadDataType;
  if (state->channels != kChannels) return zelStatusBadChannels;
  if (roi.width > state->maxWidth) return zelStatusBadSize;
  const Term term{state->taps(), state->taps()};
  runFloat(FloatSource<T>{src, srcStep, roi, kChannels, border, borderValue}, dst, dstStep, &term, 1,
           state->kernelSize, buffer);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

ZELCV_ENTRY(zeliFilterGaussianGetBufferSize)(ZeliSize roiSize, int kernelSize, ZelDataType dataType, int channels,
                                             int* stateSize, int* bufferSize) {
  if (!stateSize || !bufferSize) return zelStatusNullPointer;
  if (ZelStatus s = checkGaussianArgs(roiSize, kernelSize, dataType, channels)) return s;
  *stateSize = int(gaussianStateBytes(kernelSize));
  *bufferSize = int(filters::floatBufferBytes(roiSize.width, kernelSize, channels, 1));
  return zelStatusOk;
}

ZELCV_ENTRY(zeliFilterGaussianInit)(ZeliSize roiSize, Zel32f sigma, int kernelSize, ZelDataType dataType,
                                    int channels, ZeliFilterGaussianState* state) {
  if (!state) return zelStatusNullPointer;
  if (ZelStatus s = checkGaussianArgs(roiSize, kernelSize, dataType, channels)) return s;
  if (!std::isfinite(sigma)) return zelStatusBadArgument;
  auto* record = reinterpret_cast<GaussianState*>(alignUp(state, 16));
  *record = GaussianState{kGaussianId, kernelSize, dataType, channels, roiSize.width, {0, 0, 0}};
  gaussianTaps(kernelSize, sigma, record->taps());
  return zelStatusOk;
}

#define ZELCV_GAUSSIAN(suffix, T, channels, Value, valueArg)                                                   \
  ZELCV_ENTRY(zeliFilterGaussianBorder_##suffix)(const T* src, int srcStep, T* dst, int dstStep,              \
                                                 ZeliSize roiSize, ZeliBorderType borderType, Value borderValue, \
                                                 const ZeliFilterGaussianState* state, Zel8u* buffer) {         \
    return gaussian<T, channels>(src, srcStep, dst, dstStep, roiSize, borderType, valueArg, state, buffer);   \
  }
ZELCV_GAUSSIAN(8u_C1R, Zel8u, 1, Zel8u, &borderValue)
ZELCV_GAUSSIAN(8u_C3R, Zel8u, 3, const Zel8u*, borderValue)
ZELCV_GAUSSIAN(16u_C1R, Zel16u, 1, Zel16u, &borderValue)
ZELCV_GAUSSIAN(16u_C3R, Zel16u, 3, const Zel16u*, borderValue)
ZELCV_GAUSSIAN(32f_C1R, Zel32f, 1, Zel32f, &borderValue)
ZELCV_GAUSSIAN(32f_C3R, Zel32f, 3, const Zel32f*, borderValue)
