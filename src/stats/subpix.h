// The sub-pixel window copy: a window of the destination's size whose first
// pixel sits at centre - (size - 1) / 2, read by bilinear interpolation with
// replicated borders, and the rectangle of window pixels whose interpolation
// needed no replicated pixel. The optical flow tracker calls this directly
// for its windows, so it runs small windows with little set-up.
#ifndef ZELCV_STATS_SUBPIX_H
#define ZELCV_STATS_SUBPIX_H

#include <stdint.h>

#include "zelcv.h"

namespace zelcv {
namespace subpix {

// Where the window lies: its first pixel at (ix + a, iy + b) with
// 0 <= a, b < 1, and the four single-precision weights.
struct Placement {
  int64_t ix, iy;
  float a, b;
  float w00, w01, w10, w11;
};

// False when a centre coordinate is not finite.
bool place(ZeliPoint_32f centre, ZeliSize window, Placement* p);

// The window pixels whose every tap of non-zero weight lies in the source;
// width or height 0 when there are none.
ZeliRect insideRect(const Placement& p, ZeliSize source, ZeliSize window);

// Copies the window (arguments already checked). S: 8u, 16u or 32f; D: 8u
// (from 8u only) or 32f.
template <typename S, typename D>
void copyWindow(const S* src, int srcStep, ZeliSize srcSize, D* dst, int dstStep, ZeliSize window,
                const Placement& p);

}  // namespace subpix

// The AVX2 part of a row: columns [lo, hi) of one window row, eight at a
// time (the last eight overlapping), from row pointers a0 and a1 at column
// ix; the same bits as the SSE2 part. Only rows of eight or more such
// columns come here. Defined in subpix_avx2.cpp.
namespace avx2 {
void subpixInterior(const uint8_t* a0, const uint8_t* a1, uint8_t* d, int lo, int hi, const subpix::Placement& p);
void subpixInterior(const uint8_t* a0, const uint8_t* a1, float* d, int lo, int hi, const subpix::Placement& p);
void subpixInterior(const uint16_t* a0, const uint16_t* a1, float* d, int lo, int hi, const subpix::Placement& p);
void subpixInterior(const float* a0, const float* a1, float* d, int lo, int hi, const subpix::Placement& p);
}  // namespace avx2
}  // namespace zelcv

#endif  // ZELCV_STATS_SUBPIX_H
