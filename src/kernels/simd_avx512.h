// The instruction-set tag of the AVX-512 kernels. Only the *_avx512.cpp
// files, compiled for AVX-512 F and BW, include this; the library runs their
// kernels when the processor and the operating system support it (see
// core/load.h). As with the AVX2 files, everything they define lives in
// namespace zelcv::avx512 or is a template over avx512::Isa, and a test
// checks the objects for that.
#ifndef ZELCV_KERNELS_SIMD_AVX512_H
#define ZELCV_KERNELS_SIMD_AVX512_H

#if !defined(__AVX512F__) || !defined(__AVX512BW__)
#error "simd_avx512.h belongs to files compiled with -mavx512f -mavx512bw"
#endif

// GCC 12's AVX-512 intrinsics pass an undefined vector where no lanes are
// merged, and its uninitialized-use warnings then fire inside the header;
// include it first in an AVX-512 file so that this applies.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wuninitialized"
#pragma GCC diagnostic ignored "-Wmaybe-uninitialized"
#include <immintrin.h>
#pragma GCC diagnostic pop

namespace zelcv {
namespace avx512 {

struct Isa {
  static constexpr int kBytes = 64;
};

}  // namespace avx512
}  // namespace zelcv

#endif  // ZELCV_KERNELS_SIMD_AVX512_H
