// Super-resolution by steepest descent: the residual of a high-resolution
// estimate seen through a small point-spread function and a decimation, and
// the transpose that carries residuals back onto the high-resolution grid.
#include <string.h>

#include "core/status.h"
#include "kernels/simd.h"
#include "motion/background_state.h"

namespace zelcv {
namespace background {
namespace {

struct SuperResState {
  Head head;  // width and height unused (0)
  int32_t taps;
  int32_t scale;
  float psf[9];
};

ZelStatus superResInit(ZeliSRHNState** state, const Zel32f* psf, int scale, int taps) {
  if (ZelStatus s = checkPointers({state, psf})) return s;
  if (scale < 1 || scale > 8) return zelStatusBadRange;
  for (int i = 0; i < taps * taps; ++i) {
    const float v = simd::loadOne(psf + i);
    if (!(v >= -3.402823466e+38f && v <= 3.402823466e+38f)) return zelStatusBadRange;
  }
  SuperResState* st = static_cast<SuperResState*>(allocBytes(int(sizeof(SuperResState))));
  if (!st) return zelStatusOutOfMemory;
  memset(st, 0, sizeof *st);
  st->head.tag = taps == 2 ? kTagSuperRes2 : kTagSuperRes3;
  st->taps = taps;
  st->scale = scale;
  for (int i = 0; i < taps * taps; ++i) st->psf[i] = simd::loadOne(psf + i);
  *state = reinterpret_cast<ZeliSRHNState*>(st);
  return zelStatusOk;
}

inline int64_t clampTo(int64_t v, int64_t limit) { return v < 0 ? 0 : v >= limit ? limit - 1 : v; }

// Checks shared by both operations: the low-resolution images (8u or 32f
// source, 32f residual or gradient) and the high-resolution image.
ZelStatus checkSuperRes(std::initializer_list<ImageArg> lowRes, ImageArg highRes, ZeliSize roi, ZeliSize hrSize,
                        const ZeliSRHNState* state, uint32_t tag) {
  for (const ImageArg& im : lowRes)
    if (!im.data) return zelStatusNullPointer;
  if (!highRes.data || !state) return zelStatusNullPointer;
  if (checkSize(roi) || checkSize(hrSize)) return zelStatusBadSize;
  // Steps in argument order: the source, then the high-resolution image
  // (second in CalcResidual, the destination of UpdateGradient), then the rest.
  auto lowIt = lowRes.begin();
  if (lowIt->step <= 0 || lowIt->step < lowIt->rowBytes(roi.width)) return zelStatusBadStep;
  if (highRes.step <= 0 || highRes.step < highRes.rowBytes(hrSize.width)) return zelStatusBadStep;
  int misaligned = (lowIt->step & lowIt->alignMask) | (highRes.step & highRes.alignMask);
  for (++lowIt; lowIt != lowRes.end(); ++lowIt) {
    if (lowIt->step <= 0 || lowIt->step < lowIt->rowBytes(roi.width)) return zelStatusBadStep;
    misaligned |= lowIt->step & lowIt->alignMask;
  }
  if (misaligned) return zelStatusMisalignedStep;
  if (reinterpret_cast<const SuperResState*>(state)->head.tag != tag) return zelStatusBadContext;
  return zelStatusOk;
}

template <int P>
ZelStatus residual(const Zel8u* src, int srcStep, const Zel32f* hr, int hrStep, Zel32f* dst, int dstStep,
                   ZeliSize roi, ZeliSize hrSize, ZeliPoint offset, const ZeliSRHNState* state) {
  if (ZelStatus s = checkSuperRes({image(src, srcStep), image(dst, dstStep)}, image(hr, hrStep), roi, hrSize, state,
                                  P == 2 ? kTagSuperRes2 : kTagSuperRes3))
    return s;
  const SuperResState* st = reinterpret_cast<const SuperResState*>(state);
  const int64_t scale = st->scale;
  const uint8_t* hrBytes = reinterpret_cast<const uint8_t*>(hr);
  // Columns of every tap, clamped once per row position.
  for (int y = 0; y < roi.height; ++y) {
    const Zel8u* s = src + int64_t(y) * srcStep;
    Zel32f* d = reinterpret_cast<Zel32f*>(reinterpret_cast<uint8_t*>(dst) + int64_t(y) * dstStep);
    const Zel32f* rows[P];
    for (int j = 0; j < P; ++j)
      rows[j] = reinterpret_cast<const Zel32f*>(hrBytes +
                                                clampTo(scale * y + offset.y + j, hrSize.height) * hrStep);
    const int64_t x0 = int64_t(offset.x);
    // Interior columns need no clamping: s * x + ox in [0, W - P].
    int64_t lo = x0 >= 0 ? 0 : (-x0 + scale - 1) / scale;
    int64_t hi = hrSize.width - P - x0 < 0 ? -1 : (hrSize.width - P - x0) / scale;  // last interior x
    if (hi > roi.width - 1) hi = roi.width - 1;
    if (lo > hi + 1) lo = hi + 1;
    for (int x = 0; x < roi.width; ++x) {
      const int64_t base = scale * x + x0;
      float acc = 0.0f;
      if (x >= lo && x <= hi) {
        for (int j = 0; j < P; ++j)
          for (int i = 0; i < P; ++i) acc = acc + st->psf[j * P + i] * simd::loadOne(rows[j] + base + i);
      } else {
        for (int j = 0; j < P; ++j)
          for (int i = 0; i < P; ++i)
            acc = acc + st->psf[j * P + i] * simd::loadOne(rows[j] + clampTo(base + i, hrSize.width));
      }
      simd::storeOne(d + x, float(s[x]) - acc);
    }
  }
  return zelStatusOk;
}

template <int P>
ZelStatus gradient(const Zel32f* src, int srcStep, Zel32f* grad, int gradStep, ZeliSize roi, ZeliSize hrSize,
                   ZeliPoint offset, const ZeliSRHNState* state) {
  if (ZelStatus s = checkSuperRes({image(src, srcStep)}, image(grad, gradStep), roi, hrSize, state,
                                  P == 2 ? kTagSuperRes2 : kTagSuperRes3))
    return s;
  const SuperResState* st = reinterpret_cast<const SuperResState*>(state);
  const int64_t scale = st->scale;
  uint8_t* gradBytes = reinterpret_cast<uint8_t*>(grad);
  for (int y = 0; y < roi.height; ++y) {
    const Zel32f* r = reinterpret_cast<const Zel32f*>(reinterpret_cast<const uint8_t*>(src) + int64_t(y) * srcStep);
    Zel32f* rows[P];
    for (int j = 0; j < P; ++j)
      rows[j] = reinterpret_cast<Zel32f*>(gradBytes + clampTo(scale * y + offset.y + j, hrSize.height) * gradStep);
    for (int x = 0; x < roi.width; ++x) {
      const float v = simd::loadOne(r + x);
      const int64_t base = scale * x + offset.x;
      for (int j = 0; j < P; ++j)
        for (int i = 0; i < P; ++i) {
          Zel32f* p = rows[j] + clampTo(base + i, hrSize.width);
          simd::storeOne(p, simd::loadOne(p) + st->psf[j * P + i] * v);
        }
    }
  }
  return zelStatusOk;
}

}  // namespace
}  // namespace background
}  // namespace zelcv

using namespace zelcv::background;

#define SUPERRES_ENTRIES(p)                                                                                      \
  ZELCV_ENTRY(zeliSRHNInitAlloc_PSF##p##x##p)(ZeliSRHNState** state, const Zel32f* psf, int scale) {              \
    return superResInit(state, psf, scale, p);                                                                   \
  }                                                                                                              \
  ZELCV_ENTRY(zeliSRHNCalcResidual_PSF##p##x##p##_8u32f_C1R)(                                                    \
      const Zel8u* src, int srcStep, const Zel32f* hr, int hrStep, Zel32f* dst, int dstStep, ZeliSize roiSize,  \
      ZeliSize hrSize, ZeliPoint offset, const ZeliSRHNState* state) {                                           \
    return residual<p>(src, srcStep, hr, hrStep, dst, dstStep, roiSize, hrSize, offset, state);                   \
  }                                                                                                              \
  ZELCV_ENTRY(zeliSRHNUpdateGradient_PSF##p##x##p##_32f_C1R)(const Zel32f* src, int srcStep, Zel32f* grad,       \
                                                             int gradStep, ZeliSize roiSize, ZeliSize hrSize,    \
                                                             ZeliPoint offset, const ZeliSRHNState* state) {     \
    return gradient<p>(src, srcStep, grad, gradStep, roiSize, hrSize, offset, state);                            \
  }

SUPERRES_ENTRIES(2)
SUPERRES_ENTRIES(3)
