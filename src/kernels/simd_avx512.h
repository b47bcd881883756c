// The instruction-set tag of the AVX-512 kernels, and the 512-bit forms of
// the typed vectors in simd.h that they use (same operations, same results
// lane for lane; only F and BW instructions). Only the *_avx512.cpp
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

#include "kernels/simd.h"

namespace zelcv {
namespace avx512 {

struct Isa {
  static constexpr int kBytes = 64;
};

struct IntegerVec {
  using Raw = __m512i;
  static Raw loadu(const void* p) { return _mm512_loadu_si512(p); }
  static Raw load(const void* p) { return _mm512_load_si512(p); }
  static void storeu(void* p, Raw v) { _mm512_storeu_si512(p, v); }
  static void store(void* p, Raw v) { _mm512_store_si512(p, v); }
  // Non-temporal store; `p` must be 64-byte aligned.
  static void stream(void* p, Raw v) { _mm512_stream_si512(static_cast<__m512i*>(p), v); }
  static Raw bitOr(Raw a, Raw b) { return _mm512_or_si512(a, b); }
};

}  // namespace avx512

namespace simd {

template <> struct Vec<uint8_t, avx512::Isa> : avx512::IntegerVec {
  static constexpr int kLanes = 64;
  static Raw set1(uint8_t v) { return _mm512_set1_epi8(static_cast<char>(v)); }
  static Raw subs(Raw a, Raw b) { return _mm512_subs_epu8(a, b); }
};

template <> struct Vec<uint16_t, avx512::Isa> : avx512::IntegerVec {
  static constexpr int kLanes = 32;
  static Raw set1(uint16_t v) { return _mm512_set1_epi16(static_cast<short>(v)); }
  static Raw subs(Raw a, Raw b) { return _mm512_subs_epu16(a, b); }
};

template <> struct Vec<float, avx512::Isa> {
  using Raw = __m512;
  static constexpr int kLanes = 16;
  static Raw loadu(const void* p) { return _mm512_loadu_ps(p); }
  static Raw load(const void* p) { return _mm512_load_ps(p); }
  static void storeu(void* p, Raw v) { _mm512_storeu_ps(p, v); }
  static void store(void* p, Raw v) { _mm512_store_ps(p, v); }
  static void stream(void* p, Raw v) { _mm512_stream_ps(static_cast<float*>(p), v); }
  static Raw set1(float v) { return _mm512_set1_ps(v); }
  static Raw add(Raw a, Raw b) { return _mm512_add_ps(a, b); }
  static Raw sub(Raw a, Raw b) { return _mm512_sub_ps(a, b); }
  static Raw mul(Raw a, Raw b) { return _mm512_mul_ps(a, b); }
  // Clears the sign bit (an integer and: F has no floating-point one).
  static Raw abs(Raw a) { return _mm512_abs_ps(a); }
};

}  // namespace simd
}  // namespace zelcv

#endif  // ZELCV_KERNELS_SIMD_AVX512_H
