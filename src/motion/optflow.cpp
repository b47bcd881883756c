// Pyramidal Lucas-Kanade tracking: levels from coarse to fine, the first
// image's windows read once per level and point, the second image's window
// read again at every iteration, and a 2 x 2 system solved per iteration.
// Windows are read by the sub-pixel window copy (stats/subpix.h); the
// derivative images come from the Scharr filters (filter/derivative.h).
#include <emmintrin.h>
#include <string.h>

#include <cfloat>
#include <algorithm>
#include <cmath>
#include <type_traits>

#include "core/alloc.h"
#include "core/load.h"
#include "core/status.h"
#include "filter/derivative.h"
#include "motion/optflow_state.h"
#include "motion/optflow_sums.h"
#include "stats/subpix.h"

namespace zelcv {
namespace optflow {
namespace {

constexpr float kScale = 1.0f / 32;
// Points are ordered for cache locality in chunks of this many.
constexpr int kChunkBits = 8, kChunk = 1 << kChunkBits;
// The square root of single-precision epsilon: a step that cancels the
// previous one to within this has met an oscillation.
constexpr double kOscillation = 0.0003452669770922512;

template <typename T>
struct LevelImage {
  const T* data;
  int step;
  ZeliSize size;
};

inline float* rowAt(float* base, int stride, int y) { return base + ptrdiff_t(y) * stride; }

void scaleRows(float* p, size_t n) {
  const __m128 k = _mm_set1_ps(kScale);
  size_t i = 0;
  for (; i + 4 <= n; i += 4) _mm_storeu_ps(p + i, _mm_mul_ps(_mm_loadu_ps(p + i), k));
  for (; i < n; ++i) p[i] *= kScale;
}

// Whole-level derivative images of an 8-bit level: the filters' 16-bit
// results (32 times the derivative) straight into w.gx and w.gy,
// `size.width` values a row; the windows scale them as they read them.
void levelGradients(const LevelImage<Zel8u>& im, const WorkLayout& w) {
  const int width = im.size.width;
  const DerivativeRows rows(im.data, im.step, im.size, DerivativeKernel::kScharr3x3, zelBorderReplicate, 0,
                            w.scratch);
  Zel16s* gx = reinterpret_cast<Zel16s*>(w.gx);
  Zel16s* gy = reinterpret_cast<Zel16s*>(w.gy);
  for (int y = 0; y < im.size.height; ++y) rows.row(y, gx + ptrdiff_t(y) * width, gy + ptrdiff_t(y) * width);
}

inline __m128 scaledLoad4(const Zel16s* p) {
  const __m128i v = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(p));
  return _mm_mul_ps(_mm_cvtepi32_ps(_mm_srai_epi32(_mm_unpacklo_epi16(v, v), 16)), _mm_set1_ps(kScale));
}

// The sub-pixel copy of an n x n derivative window from a 16-bit plane:
// every tap is scaled by 1/32 (exactly: a power of two) before the copy's
// blend, ((t00 w00 + t01 w01) + t10 w10) + t11 w11, so the values equal
// those of the copy from a scaled float plane. Rows and columns clamp to
// the plane as the copy's do. The values go out converted to double, as
// the sums want them.
void copyScaledWindow(const Zel16s* plane, ZeliSize size, double* dst, int dstStride, int n,
                      const subpix::Placement& p, bool wide) {
  const int64_t W = size.width, H = size.height;
  auto clamp = [](int64_t v, int64_t lo, int64_t hi) { return v < lo ? lo : v > hi ? hi : v; };
  const int lo = int(clamp(-p.ix, 0, n)), hi = int(clamp(W - 1 - p.ix, lo, n));
  const __m128 w00 = _mm_set1_ps(p.w00), w01 = _mm_set1_ps(p.w01), w10 = _mm_set1_ps(p.w10),
               w11 = _mm_set1_ps(p.w11);
  for (int j = 0; j < n; ++j) {
    const Zel16s* s0 = plane + clamp(p.iy + j, 0, H - 1) * W;
    const Zel16s* s1 = plane + clamp(p.iy + j + 1, 0, H - 1) * W;
    double* d = dst + ptrdiff_t(j) * dstStride;
    auto one = [&](int i) {
      const int64_t c0 = clamp(p.ix + i, 0, W - 1), c1 = clamp(p.ix + i + 1, 0, W - 1);
      const float v = ((float(s0[c0]) * kScale * p.w00 + float(s0[c1]) * kScale * p.w01) +
                       float(s1[c0]) * kScale * p.w10) +
                      float(s1[c1]) * kScale * p.w11;
      d[i] = double(v);
    };
    int i = 0;
    for (; i < lo; ++i) one(i);
    auto four = [&](int at) {
      const Zel16s* a0 = s0 + (p.ix + at);
      const Zel16s* a1 = s1 + (p.ix + at);
      __m128 v = _mm_add_ps(_mm_mul_ps(scaledLoad4(a0), w00), _mm_mul_ps(scaledLoad4(a0 + 1), w01));
      v = _mm_add_ps(v, _mm_mul_ps(scaledLoad4(a1), w10));
      v = _mm_add_ps(v, _mm_mul_ps(scaledLoad4(a1 + 1), w11));
      _mm_storeu_pd(d + at, _mm_cvtps_pd(v));
      _mm_storeu_pd(d + at + 2, _mm_cvtps_pd(_mm_movehl_ps(v, v)));
    };
    if (wide && hi - lo >= 8) {
      avx2::optflowScaledInterior(s0 + (p.ix + lo), s1 + (p.ix + lo), d + lo, hi - lo, p);
      i = hi;
    }
    for (; i + 4 <= hi; i += 4) four(i);
    // A ragged end: the last four again, rewriting the same values.
    if (i < hi && hi - lo >= 4) {
      four(hi - 4);
      i = hi;
    }
    for (; i < n; ++i) one(i);
  }
}

void floatGradients(const Zel32f* src, int step, ZeliSize size, const WorkLayout& w) {
  const int stride = size.width * int(sizeof(float));
  scharr32f(src, step, size, zelBorderReplicate, w.gx, stride, w.gy, stride, static_cast<Zel8u*>(w.scratch));
  const size_t n = size_t(size.width) * size_t(size.height);
  scaleRows(w.gx, n);
  scaleRows(w.gy, n);
}

void levelGradients(const LevelImage<Zel16u>& im, const WorkLayout& w) {
  for (int y = 0; y < im.size.height; ++y) {
    const Zel16u* s = reinterpret_cast<const Zel16u*>(reinterpret_cast<const uint8_t*>(im.data) +
                                                      ptrdiff_t(y) * im.step);
    float* d = rowAt(w.level, im.size.width, y);
    for (int x = 0; x < im.size.width; ++x) d[x] = float(s[x]);
  }
  floatGradients(w.level, im.size.width * int(sizeof(float)), im.size, w);
}

void levelGradients(const LevelImage<Zel32f>& im, const WorkLayout& w) {
  floatGradients(im.data, im.step, im.size, w);
}

// Derivatives inside the margin window (winSize + 2 square, one pixel of
// margin on each side) into w.ix and w.iy.
void windowGradients(const WorkLayout& w, int n) {
  const int s = w.stride;
  for (int y = 0; y < n; ++y) {
    const float* m0 = w.margin + ptrdiff_t(y) * s;
    const float* m1 = m0 + s;
    const float* m2 = m1 + s;
    float* ox = w.ix + ptrdiff_t(y) * s;
    float* oy = w.iy + ptrdiff_t(y) * s;
    float* oi = w.i + ptrdiff_t(y) * s;
    for (int x = 0; x < n; ++x) {
      const float h0 = m0[x + 2] - m0[x], h1 = m1[x + 2] - m1[x], h2 = m2[x + 2] - m2[x];
      const float v0 = (3.0f * m0[x] + 10.0f * m0[x + 1]) + 3.0f * m0[x + 2];
      const float v2 = (3.0f * m2[x] + 10.0f * m2[x + 1]) + 3.0f * m2[x + 2];
      ox[x] = ((3.0f * h0 + 10.0f * h1) + 3.0f * h2) * kScale;
      oy[x] = (v2 - v0) * kScale;
      oi[x] = m1[x + 1];
    }
  }
}

void toDouble(const float* src, double* dst, int stride, int n) {
  for (int y = 0; y < n; ++y) {
    const float* s = src + ptrdiff_t(y) * stride;
    double* d = dst + ptrdiff_t(y) * stride;
    int x = 0;
    for (; x + 4 <= n; x += 4) {
      const __m128 v = _mm_loadu_ps(s + x);
      _mm_storeu_pd(d + x, _mm_cvtps_pd(v));
      _mm_storeu_pd(d + x + 2, _mm_cvtps_pd(_mm_movehl_ps(v, v)));
    }
    for (; x < n; ++x) d[x] = double(s[x]);
  }
}

inline ZeliRect intersect(ZeliRect a, ZeliRect b) {
  const int x0 = a.x > b.x ? a.x : b.x, y0 = a.y > b.y ? a.y : b.y;
  const int x1 = a.x + a.width < b.x + b.width ? a.x + a.width : b.x + b.width;
  const int y1 = a.y + a.height < b.y + b.height ? a.y + a.height : b.y + b.height;
  if (x1 <= x0 || y1 <= y0) return {0, 0, 0, 0};
  return {x0, y0, x1 - x0, y1 - y0};
}

inline bool sameRect(ZeliRect a, ZeliRect b) {
  return a.x == b.x && a.y == b.y && a.width == b.width && a.height == b.height;
}

// The sub-pixel copy of an image window; with AVX2 a window whose taps all
// lie inside the image (no row or column clamped) goes in one piece.
template <typename T>
void copyImageWindow(const LevelImage<T>& im, float* dst, int stride, int n, const subpix::Placement& p, bool wide) {
  if (wide && n >= 8 && p.ix >= 0 && p.iy >= 0 && p.ix + n < int64_t(im.size.width) &&
      p.iy + n < int64_t(im.size.height)) {
    avx2::optflowInteriorWindow(im.data, im.step, dst, stride, n, p);
    return;
  }
  subpix::copyWindow(im.data, im.step, im.size, dst, stride * int(sizeof(float)), {n, n}, p);
}

struct Params {
  int winSize, maxIter;
  double threshold2;
  bool wide;  // the AVX2 sums
};

// One point at one level. Returns false when the point is lost; `next`
// holds the level-0 position to store (also when lost by an empty
// intersection, which stores it).
template <typename T>
bool trackPoint(const LevelImage<T>& first, const LevelImage<T>& second, bool wholeLevel, double s,
                ZeliPoint_32f prev, ZeliPoint_32f* next, float* err, bool* storeNext, const Params& prm,
                const WorkLayout& w) {
  const int n = prm.winSize;
  const ZeliSize win{n, n};
  *storeNext = false;
  const ZeliPoint_32f p{float(double(prev.x) * s), float(double(prev.y) * s)};
  ZeliPoint_32f g{float(double(next->x) * s), float(double(next->y) * s)};

  ZeliRect ri{0, 0, 0, 0};
  subpix::Placement pp;
  if (subpix::place(p, win, &pp)) {
    ri = subpix::insideRect(pp, first.size, win);
    if (ri.width > 0) {
      const int bytes = w.stride * int(sizeof(float));
      if (wholeLevel) {
        copyImageWindow(first, w.i, w.stride, n, pp, prm.wide);
        if constexpr (std::is_same<T, Zel8u>::value) {
          copyScaledWindow(reinterpret_cast<const Zel16s*>(w.gx), first.size, w.ixd, w.stride, n, pp, prm.wide);
          copyScaledWindow(reinterpret_cast<const Zel16s*>(w.gy), first.size, w.iyd, w.stride, n, pp, prm.wide);
        } else {
          const int gstep = first.size.width * int(sizeof(float));
          subpix::copyWindow<float, float>(w.gx, gstep, first.size, w.ix, bytes, win, pp);
          subpix::copyWindow<float, float>(w.gy, gstep, first.size, w.iy, bytes, win, pp);
          toDouble(w.ix, w.ixd, w.stride, n);
          toDouble(w.iy, w.iyd, w.stride, n);
        }
      } else {
        subpix::Placement pm = pp;
        pm.ix -= 1;
        pm.iy -= 1;
        subpix::copyWindow(first.data, first.step, first.size, w.margin, bytes, {n + 2, n + 2}, pm);
        windowGradients(w, n);
        toDouble(w.ix, w.ixd, w.stride, n);
        toDouble(w.iy, w.iyd, w.stride, n);
      }
    }
  }

  const WindowSet set{w.i, w.j, w.ixd, w.iyd, w.stride};
  ZeliRect gRect{0, 0, 0, 0};
  GradientSums gs{0, 0, 0};
  double pdx = 0, pdy = 0;
  MismatchSums ms{0, 0, 0};
  ZeliRect last{0, 0, 0, 0};
  for (int k = 0;; ++k) {
    subpix::Placement pj;
    if (!subpix::place(g, win, &pj)) return false;
    const ZeliRect rj = subpix::insideRect(pj, second.size, win);
    if (rj.width == 0) return false;
    copyImageWindow(second, w.j, w.stride, n, pj, prm.wide);
    const ZeliRect r = intersect(ri, rj);
    if (r.width == 0) {
      *next = g;
      *storeNext = true;
      return false;
    }
    if (!sameRect(r, gRect)) {
      gs = prm.wide ? avx2::optflowGradientSums(set, r) : gradientSums(set, r);
      gRect = r;
    }
    ms = prm.wide ? avx2::optflowMismatchSums(set, r) : mismatchSums(set, r);
    last = r;
    const double det = gs.xx * gs.yy - gs.xy * gs.xy;
    if (!(det >= DBL_EPSILON)) return false;
    const double dx = (gs.yy * ms.bx - gs.xy * ms.by) / det;
    const double dy = (gs.xx * ms.by - gs.xy * ms.bx) / det;
    g = {float(double(g.x) + dx), float(double(g.y) + dy)};
    if (dx * dx + dy * dy < prm.threshold2) break;
    if (k > 0 && std::fabs(dx + pdx) < kOscillation && std::fabs(dy + pdy) < kOscillation) {
      g = {float(double(g.x) - dx * 0.5), float(double(g.y) - dy * 0.5)};
      break;
    }
    pdx = dx;
    pdy = dy;
    if (k + 1 >= prm.maxIter) break;
  }
  *next = g;
  *storeNext = true;
  *err = ms.e > 0 ? float(std::sqrt(ms.e / (double(last.width) * double(last.height)))) : 0.0f;
  return true;
}

template <typename T>
LevelImage<T> levelOf(const ZeliPyramid* pyr, int l) {
  return {reinterpret_cast<const T*>(pyr->images[l]), pyr->steps[l], pyr->roiSizes[l]};
}

// The pyramids' arrays and levels 0 .. maxLev: pointers, sizes, steps,
// step alignment.
template <typename T>
ZelStatus checkPyramid(const ZeliPyramid* pyr, int maxLev) {
  if (!pyr->images || !pyr->roiSizes || !pyr->scales || !pyr->steps) return zelStatusNullPointer;
  for (int l = 0; l <= maxLev; ++l)
    if (!pyr->images[l]) return zelStatusNullPointer;
  for (int l = 0; l <= maxLev; ++l)
    if (checkSize(pyr->roiSizes[l])) return zelStatusBadSize;
  for (int l = 0; l <= maxLev; ++l) {
    const ImageArg a = image(reinterpret_cast<const T*>(pyr->images[l]), pyr->steps[l]);
    if (a.step <= 0 || a.step < a.rowBytes(pyr->roiSizes[l].width)) return zelStatusBadStep;
  }
  for (int l = 0; l <= maxLev; ++l)
    if (pyr->steps[l] & (int(sizeof(T)) - 1)) return zelStatusMisalignedStep;
  return zelStatusOk;
}

template <typename T>
ZelStatus track(const ZeliPyramid* pyramid1, const ZeliPyramid* pyramid2, const ZeliPoint_32f* prevPts,
                ZeliPoint_32f* nextPts, Zel8s* status, Zel32f* error, int numFeat, int winSize, int maxLev,
                int maxIter, Zel32f threshold, ZeliOptFlowPyrLKState* state) {
  if (ZelStatus s = checkPointers({pyramid1, pyramid2, prevPts, nextPts, status, error, state})) return s;
  if (numFeat < 1 || winSize < 1 || winSize != state->winSize) return zelStatusBadSize;
  if (maxLev < 0 || maxIter < 1 || !(threshold >= 0)) return zelStatusBadArgument;
  // Statuses are 8-bit: maxLev + 1 must fit.
  if (maxLev > 126 || maxLev > pyramid1->level || maxLev > pyramid2->level) return zelStatusBadArgument;
  if (ZelStatus s = checkPyramid<T>(pyramid1, maxLev)) return s;
  if (ZelStatus s = checkPyramid<T>(pyramid2, maxLev)) return s;

  const WorkLayout w(state->work, state->roiSize, winSize);
  memset(w.i, 0, w.windowBytes);
  const Params prm{winSize, maxIter, double(threshold) * double(threshold), useAvx2Kernels()};
  for (int i = 0; i < numFeat; ++i) status[i] = Zel8s(maxLev + 1);
  for (int l = maxLev; l >= 0; --l) {
    const Zel8s active = Zel8s(l + 1);
    bool any = false;
    for (int i = 0; i < numFeat && !any; ++i) any = status[i] == active;
    if (!any) continue;
    const LevelImage<T> first = levelOf<T>(pyramid1, l), second = levelOf<T>(pyramid2, l);
    const bool whole = first.size.width <= state->roiSize.width && first.size.height <= state->roiSize.height;
    if (whole) levelGradients(first, w);
    const double s = pyramid1->scales[l];
    auto trackOne = [&](int i) {
      status[i] = Zel8s(l);
      ZeliPoint_32f g = nextPts[i];
      float e = 0;
      bool store = false;
      const bool kept = trackPoint(first, second, whole, s, prevPts[i], &g, &e, &store, prm, w);
      if (store)
        nextPts[i] = l == 0 ? g : ZeliPoint_32f{float(double(g.x) / s), float(double(g.y) / s)};
      if (kept) {
        error[i] = e;
      } else {
        status[i] = active;
        error[i] = 0;
      }
    };
    // Points do not depend on each other: visit them in chunks, each in
    // order of image row, so that neighbouring windows share cached rows.
    for (int from = 0; from < numFeat; from += kChunk) {
      int64_t order[kChunk];
      int count = 0;
      for (int i = from; i < numFeat && i < from + kChunk; ++i) {
        if (status[i] != active) continue;
        const float y = prevPts[i].y;
        const int64_t row = std::isfinite(y) ? int64_t(y < -1e9f ? -1e9f : y > 1e9f ? 1e9f : y) : -2000000000;
        order[count++] = row * kChunk + (i - from);
      }
      std::sort(order, order + count);
      for (int k = 0; k < count; ++k) trackOne(from + int(order[k] - (order[k] >> kChunkBits) * kChunk));
    }
  }
  return zelStatusOk;
}

}  // namespace
}  // namespace optflow
}  // namespace zelcv

#define ZELCV_OPTFLOW_TRACK(suffix, T)                                                                            \
  ZELCV_ENTRY(zeliOpticalFlowPyrLK_##suffix)(const ZeliPyramid* pyramid1, const ZeliPyramid* pyramid2,           \
                                             const ZeliPoint_32f* prevPts, ZeliPoint_32f* nextPts, Zel8s* status, \
                                             Zel32f* error, int numFeat, int winSize, int maxLev, int maxIter,    \
                                             Zel32f threshold, ZeliOptFlowPyrLKState* state) {                    \
    return zelcv::optflow::track<T>(pyramid1, pyramid2, prevPts, nextPts, status, error, numFeat, winSize,       \
                                    maxLev, maxIter, threshold, state);                                           \
  }

ZELCV_OPTFLOW_TRACK(8u_C1R, Zel8u)
ZELCV_OPTFLOW_TRACK(16u_C1R, Zel16u)
ZELCV_OPTFLOW_TRACK(32f_C1R, Zel32f)
