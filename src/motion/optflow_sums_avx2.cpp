// The AVX2 form of the iteration sums: the four lanes in one register, the
// same products and the same additions, so the same bits as the SSE2 form.
#include <immintrin.h>

#include "motion/optflow_sums.h"

namespace zelcv {
namespace avx2 {
namespace {

// All-ones in the first n of four lanes (n = 1 .. 4).
inline __m256d optflowTailMask(int n) {
  return _mm256_castsi256_pd(_mm256_cmpgt_epi64(_mm256_set1_epi64x(n), _mm256_set_epi64x(3, 2, 1, 0)));
}

inline double optflowTotal(__m256d v) {
  double l[4];
  _mm256_storeu_pd(l, v);
  return (l[0] + l[1]) + (l[2] + l[3]);
}

}  // namespace

optflow::GradientSums optflowGradientSums(const optflow::WindowSet& w, ZeliRect r) {
  __m256d xx = _mm256_setzero_pd(), xy = _mm256_setzero_pd(), yy = _mm256_setzero_pd();
  const __m256d tail = optflowTailMask(((r.width - 1) & 3) + 1);
  const int full = (r.width - 1) & ~3;
  for (int y = r.y; y < r.y + r.height; ++y) {
    const double* gx = w.ix + ptrdiff_t(y) * w.stride + r.x;
    const double* gy = w.iy + ptrdiff_t(y) * w.stride + r.x;
    for (int c = 0; c < full; c += 4) {
      const __m256d x = _mm256_loadu_pd(gx + c), v = _mm256_loadu_pd(gy + c);
      xx = _mm256_add_pd(xx, _mm256_mul_pd(x, x));
      xy = _mm256_add_pd(xy, _mm256_mul_pd(x, v));
      yy = _mm256_add_pd(yy, _mm256_mul_pd(v, v));
    }
    const __m256d x = _mm256_loadu_pd(gx + full), v = _mm256_loadu_pd(gy + full);
    xx = _mm256_add_pd(xx, _mm256_and_pd(_mm256_mul_pd(x, x), tail));
    xy = _mm256_add_pd(xy, _mm256_and_pd(_mm256_mul_pd(x, v), tail));
    yy = _mm256_add_pd(yy, _mm256_and_pd(_mm256_mul_pd(v, v), tail));
  }
  return {optflowTotal(xx), optflowTotal(xy), optflowTotal(yy)};
}

optflow::MismatchSums optflowMismatchSums(const optflow::WindowSet& w, ZeliRect r) {
  __m256d bx = _mm256_setzero_pd(), by = _mm256_setzero_pd(), e = _mm256_setzero_pd();
  const __m256d tail = optflowTailMask(((r.width - 1) & 3) + 1);
  const int full = (r.width - 1) & ~3;
  for (int y = r.y; y < r.y + r.height; ++y) {
    const ptrdiff_t at = ptrdiff_t(y) * w.stride + r.x;
    const float* a = w.i + at;
    const float* b = w.j + at;
    const double* gx = w.ix + at;
    const double* gy = w.iy + at;
    for (int c = 0; c < full; c += 4) {
      const __m256d d = _mm256_cvtps_pd(_mm_sub_ps(_mm_loadu_ps(a + c), _mm_loadu_ps(b + c)));
      bx = _mm256_add_pd(bx, _mm256_mul_pd(d, _mm256_loadu_pd(gx + c)));
      by = _mm256_add_pd(by, _mm256_mul_pd(d, _mm256_loadu_pd(gy + c)));
      e = _mm256_add_pd(e, _mm256_mul_pd(d, d));
    }
    const __m256d d = _mm256_cvtps_pd(_mm_sub_ps(_mm_loadu_ps(a + full), _mm_loadu_ps(b + full)));
    bx = _mm256_add_pd(bx, _mm256_and_pd(_mm256_mul_pd(d, _mm256_loadu_pd(gx + full)), tail));
    by = _mm256_add_pd(by, _mm256_and_pd(_mm256_mul_pd(d, _mm256_loadu_pd(gy + full)), tail));
    e = _mm256_add_pd(e, _mm256_and_pd(_mm256_mul_pd(d, d), tail));
  }
  return {optflowTotal(bx), optflowTotal(by), optflowTotal(e)};
}

namespace {

inline __m256 windowLoad8(const float* p) { return _mm256_loadu_ps(p); }
inline __m256 windowLoad8(const uint8_t* p) {
  return _mm256_cvtepi32_ps(_mm256_cvtepu8_epi32(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p))));
}
inline __m256 windowLoad8(const uint16_t* p) {
  return _mm256_cvtepi32_ps(_mm256_cvtepu16_epi32(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p))));
}

template <typename S>
void interiorWindow(const S* src, int step, float* dst, int dstStride, int n, const subpix::Placement& p) {
  const __m256 w00 = _mm256_set1_ps(p.w00), w01 = _mm256_set1_ps(p.w01), w10 = _mm256_set1_ps(p.w10),
               w11 = _mm256_set1_ps(p.w11);
  const char* base = reinterpret_cast<const char*>(src + p.ix) + ptrdiff_t(step) * ptrdiff_t(p.iy);
  for (int j = 0; j < n; ++j) {
    const S* a0 = reinterpret_cast<const S*>(base + ptrdiff_t(step) * j);
    const S* a1 = reinterpret_cast<const S*>(base + ptrdiff_t(step) * (j + 1));
    float* d = dst + ptrdiff_t(j) * dstStride;
    auto eight = [&](int at) {
      __m256 v = _mm256_add_ps(_mm256_mul_ps(windowLoad8(a0 + at), w00), _mm256_mul_ps(windowLoad8(a0 + at + 1), w01));
      v = _mm256_add_ps(v, _mm256_mul_ps(windowLoad8(a1 + at), w10));
      _mm256_storeu_ps(d + at, _mm256_add_ps(v, _mm256_mul_ps(windowLoad8(a1 + at + 1), w11)));
    };
    int i = 0;
    for (; i + 8 <= n; i += 8) eight(i);
    if (i < n) eight(n - 8);
  }
}

}  // namespace

void optflowInteriorWindow(const Zel8u* src, int step, float* dst, int dstStride, int n, const subpix::Placement& p) {
  interiorWindow(src, step, dst, dstStride, n, p);
}
void optflowInteriorWindow(const Zel16u* src, int step, float* dst, int dstStride, int n,
                           const subpix::Placement& p) {
  interiorWindow(src, step, dst, dstStride, n, p);
}
void optflowInteriorWindow(const Zel32f* src, int step, float* dst, int dstStride, int n,
                           const subpix::Placement& p) {
  interiorWindow(src, step, dst, dstStride, n, p);
}

void optflowScaledInterior(const Zel16s* a0, const Zel16s* a1, double* d, int count, const subpix::Placement& p) {
  const __m256 w00 = _mm256_set1_ps(p.w00), w01 = _mm256_set1_ps(p.w01), w10 = _mm256_set1_ps(p.w10),
               w11 = _mm256_set1_ps(p.w11), scale = _mm256_set1_ps(1.0f / 32);
  auto load = [&](const Zel16s* q) {
    return _mm256_mul_ps(
        _mm256_cvtepi32_ps(_mm256_cvtepi16_epi32(_mm_loadu_si128(reinterpret_cast<const __m128i*>(q)))), scale);
  };
  auto eight = [&](int at) {
    __m256 v = _mm256_add_ps(_mm256_mul_ps(load(a0 + at), w00), _mm256_mul_ps(load(a0 + at + 1), w01));
    v = _mm256_add_ps(v, _mm256_mul_ps(load(a1 + at), w10));
    v = _mm256_add_ps(v, _mm256_mul_ps(load(a1 + at + 1), w11));
    _mm256_storeu_pd(d + at, _mm256_cvtps_pd(_mm256_castps256_ps128(v)));
    _mm256_storeu_pd(d + at + 4, _mm256_cvtps_pd(_mm256_extractf128_ps(v, 1)));
  };
  int i = 0;
  for (; i + 8 <= count; i += 8) eight(i);
  if (i < count) eight(count - 8);
}

}  // namespace avx2
}  // namespace zelcv
