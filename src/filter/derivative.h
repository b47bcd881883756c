// Both first derivatives of 8-bit images (3x3 Sobel, 3x3 Scharr, 5x5 Sobel),
// produced one output row at a time so that a caller can consume them while
// they are still in the first-level cache. The Canny detector streams through
// them. They run on the integer engine of the exported derivative filters
// (derivative_kernels.h), with the same taps, so both give the same values.
#ifndef ZELCV_FILTER_DERIVATIVE_H
#define ZELCV_FILTER_DERIVATIVE_H

#include <stddef.h>
#include <stdint.h>

#include "zelcv.h"

namespace zelcv {

// Separable kernels: a derivative across one axis times a smoothing along the
// other.
//   kSobel3x3:  derivative -1 0 1,       smoothing 1 2 1
//   kScharr3x3: derivative -1 0 1,       smoothing 3 10 3
//   kSobel5x5:  derivative -1 -2 0 2 1,  smoothing 1 4 6 4 1
// dx is positive where brightness grows to the right, dy where it grows
// downwards. No result leaves the 16-bit range (at most 24480 in magnitude).
enum class DerivativeKernel { kSobel3x3, kScharr3x3, kSobel5x5 };

inline int derivativeRadius(DerivativeKernel kernel) {
  return kernel == DerivativeKernel::kSobel5x5 ? 2 : 1;
}

// Pixels outside the image come from the border type: zelBorderConstant
// (borderValue), replicate, wrap, the mirror kinds, and the in-memory kind or
// side flags (read at their natural addresses). A pixel beyond both a row end
// and a column end is found by the vertical rule first (which row stands for
// it), then by the horizontal rule within that row; a constant row stays
// constant whatever the horizontal rule.
class DerivativeRows {
 public:
  // Scratch bytes that the constructor's `scratch` must provide (no alignment
  // needed).
  static size_t scratchBytes(DerivativeKernel kernel, int width);

  DerivativeRows(const Zel8u* src, int srcStep, ZeliSize roi, DerivativeKernel kernel,
                 ZeliBorderType border, Zel8u borderValue, void* scratch);

  // dx and dy of image row y (0 <= y < height), width values each.
  void row(int y, Zel16s* dx, Zel16s* dy) const;

 private:
  const Zel8u* src_;
  int srcStep_;
  ZeliSize roi_;
  DerivativeKernel kernel_;
  ZeliBorderType border_;
  Zel8u borderValue_;
  Zel16s* smooth_;  // width + 2 * radius column sums across rows
  Zel16s* diff_;    // width + 2 * radius column differences across rows
  Zel8u* constantRow_;  // width pixels of borderValue (constant kind only)
};

// The derivatives of 32f images, by the engine of the exported 32f members
// (filters_float.cpp), with the same taps as above: per term, the row taps
// over the extended source row with products and sum in double (tap 0 first)
// rounded once to float, then the column taps over those rows in float (tap 0
// first, a multiplication then an addition per tap). dx is then the bits of
// the 32f filter with derivative taps along the row and smoothing taps down
// the column, dy of its transpose. Borders: every kind and side flag of
// derivative filters; the constant kind takes borderValue.
//
// scharr32f writes both 3x3 Scharr derivative images at once (dx as
// ScharrVert, dy as ScharrHoriz), through the engine's ring of row-pass
// results; `buffer` holds scharr32fBufferBytes(width) bytes at any address;
// the border value of the constant kind is 0.
int64_t scharr32fBufferBytes(int width);
void scharr32f(const Zel32f* src, int srcStep, ZeliSize roi, ZeliBorderType border, Zel32f* dx, int dxStep,
               Zel32f* dy, int dyStep, Zel8u* buffer);

// One row at a time, in little scratch (no ring: the row-pass results an
// output row needs are formed again for each row).
class DerivativeRows32f {
 public:
  // Scratch bytes that the constructor's `scratch` must provide (no alignment
  // needed): at most 8 width + 48.
  static size_t scratchBytes(DerivativeKernel kernel, int width);

  DerivativeRows32f(const Zel32f* src, int srcStep, ZeliSize roi, DerivativeKernel kernel,
                    ZeliBorderType border, Zel32f borderValue, void* scratch);

  // dx and dy of image row y (0 <= y < height), width values each.
  void row(int y, Zel32f* dx, Zel32f* dy) const;

 private:
  const Zel32f* src_;
  int srcStep_;
  ZeliSize roi_;
  DerivativeKernel kernel_;
  ZeliBorderType border_;
  Zel32f borderValue_;
  Zel32f* ext_;     // width + 2 * radius: the extended source row
  Zel32f* rowSum_;  // width: one row-pass result
};

}  // namespace zelcv

#endif  // ZELCV_FILTER_DERIVATIVE_H
