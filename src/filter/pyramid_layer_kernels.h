// Inner loops of the pyramid layers, one instance per instruction set (the
// baseline ones in pyramid_layer.cpp, the AVX2 ones in pyramid_layer_avx2.cpp).
// Every instance gives the same bits: the lanes do the scalar arithmetic in
// the scalar order.
#ifndef ZELCV_FILTER_PYRAMID_LAYER_KERNELS_H
#define ZELCV_FILTER_PYRAMID_LAYER_KERNELS_H

#include <stdint.h>

#include "kernels/dispatch.h"

namespace zelcv {
namespace layer {

// Every second column of an 8u row filtered with integer taps:
// out[j] = float(sum over k < kerSize of taps[k] * q[2j + k]) * unit, for j
// from 0 while q[0 .. avail - 1] holds the bytes read; returns how many
// columns were done (the caller finishes the rest). `taps` holds kerSize + 1
// entries, the last 0, so that taps pair up. The integer sum is the float
// sum of the scalar path whenever every partial sum stays below 2^24 units,
// which the caller makes sure of.
template <typename Isa>
int evenColumns8u(const uint8_t* q, int avail, const int16_t* taps, int kerSize, int count, float unit, float* out);

// out[i] = taps[0] * rows[0][i] + taps[1] * rows[1][i] + ..., summed in tap
// order, for i < n.
template <typename Isa>
void weightedRows(const float* const* rows, const float* taps, int kerSize, int n, float* out);

// d[i] = the byte of f[i] + 0.5, clamped to 0 .. 255 and truncated (NaN
// gives 0), for i < n.
template <typename Isa>
void floatsToBytes(const float* f, int n, uint8_t* d);

template <> int evenColumns8u<simd::Sse2>(const uint8_t*, int, const int16_t*, int, int, float, float*);
template <> void weightedRows<simd::Sse2>(const float* const*, const float*, int, int, float*);
template <> void floatsToBytes<simd::Sse2>(const float*, int, uint8_t*);
template <> int evenColumns8u<avx2::Isa>(const uint8_t*, int, const int16_t*, int, int, float, float*);
template <> void weightedRows<avx2::Isa>(const float* const*, const float*, int, int, float*);
template <> void floatsToBytes<avx2::Isa>(const float*, int, uint8_t*);

// The three routines on one instruction set.
struct Kernels {
  int (*evenColumns8u)(const uint8_t*, int, const int16_t*, int, int, float, float*);
  void (*weightedRows)(const float* const*, const float*, int, int, float*);
  void (*floatsToBytes)(const float*, int, uint8_t*);
};

inline Kernels chosenKernels() {
  return withChosenIsa<IsaLevel::Avx2>([](auto tag) {
    using Isa = typename decltype(tag)::Isa;
    return Kernels{&evenColumns8u<Isa>, &weightedRows<Isa>, &floatsToBytes<Isa>};
  });
}

}  // namespace layer
}  // namespace zelcv

#endif  // ZELCV_FILTER_PYRAMID_LAYER_KERNELS_H
