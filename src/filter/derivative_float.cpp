// First derivatives of 32f images, one row at a time (see derivative.h). The
// vector loops perform the scalar loops' operations in the same order, four
// columns at a time, so both give the same bits.
#include <emmintrin.h>

#include "core/alloc.h"
#include "filter/border.h"
#include "filter/derivative.h"

namespace zelcv {

namespace {

struct FloatTaps {
  int count;
  float smooth[5];
  float first[5];
};

const FloatTaps& tapsOf(DerivativeKernel kernel) {
  static const FloatTaps kSobel3 = {3, {1, 2, 1}, {-1, 0, 1}};
  static const FloatTaps kScharr3 = {3, {3, 10, 3}, {-1, 0, 1}};
  static const FloatTaps kSobel5 = {5, {1, 4, 6, 4, 1}, {-1, -2, 0, 2, 1}};
  return kernel == DerivativeKernel::kSobel5x5 ? kSobel5 : kernel == DerivativeKernel::kScharr3x3 ? kScharr3 : kSobel3;
}

// out[i] = sum over taps t of taps[t] * in[t][i], t ascending, zero taps skipped.
void tapSum(const float* const* in, const float* taps, int count, float* out, int n) {
  int i = 0;
  for (; i + 4 <= n; i += 4) {
    __m128 acc = _mm_setzero_ps();
    for (int t = 0; t < count; ++t)
      if (taps[t] != 0.0f) acc = _mm_add_ps(acc, _mm_mul_ps(_mm_set1_ps(taps[t]), _mm_loadu_ps(in[t] + i)));
    _mm_storeu_ps(out + i, acc);
  }
  for (; i < n; ++i) {
    float acc = 0.0f;
    for (int t = 0; t < count; ++t)
      if (taps[t] != 0.0f) acc = acc + taps[t] * in[t][i];
    out[i] = acc;
  }
}

}  // namespace

size_t DerivativeRows32f::scratchBytes(DerivativeKernel kernel, int width) {
  return 16 + 2 * (size_t(width) + 2 * size_t(derivativeRadius(kernel))) * sizeof(Zel32f);
}

DerivativeRows32f::DerivativeRows32f(const Zel32f* src, int srcStep, ZeliSize roi, DerivativeKernel kernel,
                                     ZeliBorderType border, Zel32f borderValue, void* scratch)
    : src_(src), srcStep_(srcStep), roi_(roi), kernel_(kernel), border_(border), borderValue_(borderValue) {
  smooth_ = reinterpret_cast<Zel32f*>(alignUp(scratch, 16));
  diff_ = smooth_ + size_t(roi.width) + 2 * size_t(derivativeRadius(kernel));
}

void DerivativeRows32f::row(int y, Zel32f* dx, Zel32f* dy) const {
  const FloatTaps& taps = tapsOf(kernel_);
  const int r = taps.count / 2, w = roi_.width;
  const int kind = borderKind(border_);
  // Column values of the interior columns; a constant row contributes the
  // border value at every column.
  const float* rows[5];
  float constant[5][4];
  bool anyConstant = false;
  for (int t = 0; t < taps.count; ++t) {
    const int sy = y - r + t;
    if ((sy < 0 || sy >= roi_.height) && kind == zelBorderConstant) {
      rows[t] = nullptr;
      anyConstant = true;
    } else {
      const int index = borderIndex(sy, roi_.height, kind);
      rows[t] = reinterpret_cast<const float*>(reinterpret_cast<const uint8_t*>(src_) + ptrdiff_t(index) * srcStep_);
    }
  }
  if (anyConstant) {
    // Rows of the border value are read through a small constant block; the
    // loops then see them as ordinary rows of the same value, column by column.
    for (int t = 0; t < taps.count; ++t)
      for (int i = 0; i < 4; ++i) constant[t][i] = borderValue_;
  }
  float* a = smooth_ + r;
  float* b = diff_ + r;
  if (!anyConstant) {
    tapSum(rows, taps.smooth, taps.count, a, w);
    tapSum(rows, taps.first, taps.count, b, w);
  } else {
    // Row by row of constants: per column, each row value is either the
    // source pixel or the border value, in the same order of taps.
    for (int x = 0; x < w; ++x) {
      float sa = 0.0f, sb = 0.0f;
      for (int t = 0; t < taps.count; ++t) {
        const float v = rows[t] ? rows[t][x] : constant[t][0];
        if (taps.smooth[t] != 0.0f) sa = sa + taps.smooth[t] * v;
        if (taps.first[t] != 0.0f) sb = sb + taps.first[t] * v;
      }
      a[x] = sa;
      b[x] = sb;
    }
  }
  // Columns beyond the row ends: the column standing for them, or a column of
  // the border value (whole column, whatever row it is in).
  for (int x = -r; x < w + r; ++x) {
    if (x >= 0 && x < w) continue;
    if (kind == zelBorderConstant) {
      float sa = 0.0f, sb = 0.0f;
      for (int t = 0; t < taps.count; ++t) {
        if (taps.smooth[t] != 0.0f) sa = sa + taps.smooth[t] * borderValue_;
        if (taps.first[t] != 0.0f) sb = sb + taps.first[t] * borderValue_;
      }
      a[x] = sa;
      b[x] = sb;
    } else {
      const int index = borderIndex(x, w, kind);
      a[x] = a[index];
      b[x] = b[index];
    }
  }
  // Across: dx from the smoothed columns with the derivative taps, dy from the
  // differenced columns with the smoothing taps.
  const float* inA[5];
  const float* inB[5];
  for (int t = 0; t < taps.count; ++t) {
    inA[t] = smooth_ + t;
    inB[t] = diff_ + t;
  }
  tapSum(inA, taps.first, taps.count, dx, w);
  tapSum(inB, taps.smooth, taps.count, dy, w);
}

}  // namespace zelcv
