// The mixture model's per-frame constants and the AVX2 and AVX-512 row
// kernels that the baseline code hands whole runs of pixel groups to.
#ifndef ZELCV_MOTION_FGMM_KERNELS_H
#define ZELCV_MOTION_FGMM_KERNELS_H

#include <stdint.h>

namespace zelcv {
namespace background {

constexpr int kFields = 5;  // w, u0, u1, u2, v per component, four pixels each

// a, b = 1 - a, c = a * complexity and the parameters, for one frame.
struct FrameScalars {
  float a, b, c, tb, tg, ratio, varInit, varMin, varMax;
};

}  // namespace background

namespace avx2 {
// Runs the frame over a row's pixels eight at a time (two groups of four,
// `g` the row's first group) while eight remain; returns the pixels done.
// Built in fgmm_avx2.cpp; the same operations lane for lane as the
// baseline, so the same bits.
int fgmmRow(int components, const uint8_t* src, uint8_t* dst, float* g, int width,
            const background::FrameScalars& f);
}  // namespace avx2

namespace avx512 {
// The same for sixteen pixels at a time (four groups), in fgmm_avx512.cpp.
int fgmmRow(int components, const uint8_t* src, uint8_t* dst, float* g, int width,
            const background::FrameScalars& f);
}  // namespace avx512
}  // namespace zelcv

#endif  // ZELCV_MOTION_FGMM_KERNELS_H
