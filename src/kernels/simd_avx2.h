// The 256-bit AVX2 forms of the typed vectors in simd.h, with the same
// operations and the same results lane for lane. Only the *_avx2.cpp files,
// compiled for AVX2, include this; the library runs their kernels when the
// processor and the operating system support AVX2 (see core/load.h).
//
// Everything an AVX2 file defines lives in namespace zelcv::avx2 or is a
// template over avx2::Isa: an inline function shared by name with the
// baseline files could otherwise be merged by the linker into its AVX2 copy
// and run on processors without AVX2. A test checks the objects for that.
#ifndef ZELCV_KERNELS_SIMD_AVX2_H
#define ZELCV_KERNELS_SIMD_AVX2_H

#ifndef __AVX2__
#error "simd_avx2.h belongs to files compiled with -mavx2"
#endif

#include <immintrin.h>

#include "kernels/simd.h"

namespace zelcv {
namespace avx2 {

struct Isa {
  static constexpr int kBytes = 32;
};

struct IntegerVec {
  using Raw = __m256i;
  static Raw loadu(const void* p) { return _mm256_loadu_si256(static_cast<const __m256i*>(p)); }
  static Raw load(const void* p) { return _mm256_load_si256(static_cast<const __m256i*>(p)); }
  static void storeu(void* p, Raw v) { _mm256_storeu_si256(static_cast<__m256i*>(p), v); }
  static void store(void* p, Raw v) { _mm256_store_si256(static_cast<__m256i*>(p), v); }
  // Non-temporal store; `p` must be 32-byte aligned.
  static void stream(void* p, Raw v) { _mm256_stream_si256(static_cast<__m256i*>(p), v); }
  static Raw bitOr(Raw a, Raw b) { return _mm256_or_si256(a, b); }
};

}  // namespace avx2

namespace simd {

template <> struct Vec<uint8_t, avx2::Isa> : avx2::IntegerVec {
  static constexpr int kLanes = 32;
  static Raw set1(uint8_t v) { return _mm256_set1_epi8(static_cast<char>(v)); }
  static Raw min(Raw a, Raw b) { return _mm256_min_epu8(a, b); }
  static Raw max(Raw a, Raw b) { return _mm256_max_epu8(a, b); }
  static Raw subs(Raw a, Raw b) { return _mm256_subs_epu8(a, b); }
};

template <> struct Vec<int8_t, avx2::Isa> : avx2::IntegerVec {
  static constexpr int kLanes = 32;
  static Raw set1(int8_t v) { return _mm256_set1_epi8(v); }
  static Raw min(Raw a, Raw b) { return _mm256_min_epi8(a, b); }
  static Raw max(Raw a, Raw b) { return _mm256_max_epi8(a, b); }
};

template <> struct Vec<int16_t, avx2::Isa> : avx2::IntegerVec {
  static constexpr int kLanes = 16;
  static Raw set1(int16_t v) { return _mm256_set1_epi16(v); }
  static Raw min(Raw a, Raw b) { return _mm256_min_epi16(a, b); }
  static Raw max(Raw a, Raw b) { return _mm256_max_epi16(a, b); }
  static Raw subs(Raw a, Raw b) { return _mm256_subs_epi16(a, b); }
};

template <> struct Vec<uint16_t, avx2::Isa> : avx2::IntegerVec {
  static constexpr int kLanes = 16;
  static Raw set1(uint16_t v) { return _mm256_set1_epi16(static_cast<short>(v)); }
  static Raw min(Raw a, Raw b) { return _mm256_min_epu16(a, b); }
  static Raw max(Raw a, Raw b) { return _mm256_max_epu16(a, b); }
  static Raw subs(Raw a, Raw b) { return _mm256_subs_epu16(a, b); }
};

template <> struct Vec<int32_t, avx2::Isa> : avx2::IntegerVec {
  static constexpr int kLanes = 8;
  static Raw set1(int32_t v) { return _mm256_set1_epi32(v); }
  static Raw min(Raw a, Raw b) { return _mm256_min_epi32(a, b); }
  static Raw max(Raw a, Raw b) { return _mm256_max_epi32(a, b); }
};

template <> struct Vec<float, avx2::Isa> {
  using Raw = __m256;
  static constexpr int kLanes = 8;
  static Raw loadu(const void* p) { return _mm256_loadu_ps(static_cast<const float*>(p)); }
  static Raw load(const void* p) { return _mm256_load_ps(static_cast<const float*>(p)); }
  static void storeu(void* p, Raw v) { _mm256_storeu_ps(static_cast<float*>(p), v); }
  static void store(void* p, Raw v) { _mm256_store_ps(static_cast<float*>(p), v); }
  static void stream(void* p, Raw v) { _mm256_stream_ps(static_cast<float*>(p), v); }
  static Raw set1(float v) { return _mm256_set1_ps(v); }
  // Same operand order as the SSE2 forms: the second operand wins ties and
  // unordered pairs.
  static Raw min(Raw a, Raw b) { return _mm256_min_ps(a, b); }
  static Raw max(Raw a, Raw b) { return _mm256_max_ps(a, b); }
  static Raw add(Raw a, Raw b) { return _mm256_add_ps(a, b); }
  static Raw sub(Raw a, Raw b) { return _mm256_sub_ps(a, b); }
  static Raw mul(Raw a, Raw b) { return _mm256_mul_ps(a, b); }
  static Raw abs(Raw a) { return _mm256_andnot_ps(_mm256_set1_ps(-0.0f), a); }
};

}  // namespace simd
}  // namespace zelcv

#endif  // ZELCV_KERNELS_SIMD_AVX2_H
