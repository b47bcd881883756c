// The SIMD abstraction every kernel is written against: vectors typed by
// element, so that one template serves 8u, 8s, 16u, 16s, 32s and 32f, and by
// instruction set, so that one kernel serves every vector width. This file
// holds the baseline, 128-bit SSE2, which both x86 targets have; the 256-bit
// AVX2 forms are in simd_avx2.h, compiled only into the *_avx2.cpp files.
#ifndef ZELCV_KERNELS_SIMD_H
#define ZELCV_KERNELS_SIMD_H

#include <emmintrin.h>
#include <stddef.h>
#include <stdint.h>
#include <string.h>

namespace zelcv {

// The wider instruction sets' tags: defined in simd_avx2.h and simd_avx512.h,
// which only the files compiled for them include.
namespace avx2 {
struct Isa;
}
namespace avx512 {
struct Isa;
}

namespace simd {

// One element at an address that may be misaligned for T (rows of 32f
// images whose steps are not multiples of 4): every scalar access to a
// caller's row that may be so goes through these, which compile to one
// plain move.
template <typename T>
inline T loadOne(const T* p) {
  T v;
  memcpy(&v, p, sizeof v);
  return v;
}
template <typename T>
inline void storeOne(T* p, T v) {
  memcpy(p, &v, sizeof v);
}

// The alignment granule of the row driver: heads run to a 16-byte boundary
// whatever the vector width.
constexpr int kBytes = 16;

// The baseline instruction set.
struct Sse2 {
  static constexpr int kBytes = 16;
};

template <typename T, typename Isa = Sse2> struct Vec;

// Integer vectors share loads and stores.
struct IntegerVec {
  using Raw = __m128i;
  static Raw loadu(const void* p) { return _mm_loadu_si128(static_cast<const __m128i*>(p)); }
  static Raw load(const void* p) { return _mm_load_si128(static_cast<const __m128i*>(p)); }
  static void storeu(void* p, Raw v) { _mm_storeu_si128(static_cast<__m128i*>(p), v); }
  static void store(void* p, Raw v) { _mm_store_si128(static_cast<__m128i*>(p), v); }
  // Non-temporal store; `p` must be 16-byte aligned.
  static void stream(void* p, Raw v) { _mm_stream_si128(static_cast<__m128i*>(p), v); }
  static Raw bitOr(Raw a, Raw b) { return _mm_or_si128(a, b); }
};

template <> struct Vec<uint8_t> : IntegerVec {
  static constexpr int kLanes = 16;
  static Raw set1(uint8_t v) { return _mm_set1_epi8(static_cast<char>(v)); }
  static Raw min(Raw a, Raw b) { return _mm_min_epu8(a, b); }
  static Raw max(Raw a, Raw b) { return _mm_max_epu8(a, b); }
  static Raw subs(Raw a, Raw b) { return _mm_subs_epu8(a, b); }
};

template <> struct Vec<int8_t> : IntegerVec {
  static constexpr int kLanes = 16;
  static Raw set1(int8_t v) { return _mm_set1_epi8(v); }
  // SSE2 has no signed byte min/max: flip the sign bit, use the unsigned ones.
  static Raw min(Raw a, Raw b) { return flip(_mm_min_epu8(flip(a), flip(b))); }
  static Raw max(Raw a, Raw b) { return flip(_mm_max_epu8(flip(a), flip(b))); }
  static Raw flip(Raw a) { return _mm_xor_si128(a, _mm_set1_epi8(static_cast<char>(0x80))); }
};

template <> struct Vec<int16_t> : IntegerVec {
  static constexpr int kLanes = 8;
  static Raw set1(int16_t v) { return _mm_set1_epi16(v); }
  static Raw min(Raw a, Raw b) { return _mm_min_epi16(a, b); }
  static Raw max(Raw a, Raw b) { return _mm_max_epi16(a, b); }
  static Raw subs(Raw a, Raw b) { return _mm_subs_epi16(a, b); }
};

template <> struct Vec<uint16_t> : IntegerVec {
  static constexpr int kLanes = 8;
  static Raw set1(uint16_t v) { return _mm_set1_epi16(static_cast<short>(v)); }
  // SSE2 has only signed 16-bit min/max: a - sat(a - b) and b + sat(a - b).
  static Raw min(Raw a, Raw b) { return _mm_sub_epi16(a, _mm_subs_epu16(a, b)); }
  static Raw max(Raw a, Raw b) { return _mm_add_epi16(b, _mm_subs_epu16(a, b)); }
  static Raw subs(Raw a, Raw b) { return _mm_subs_epu16(a, b); }
};

template <> struct Vec<int32_t> : IntegerVec {
  static constexpr int kLanes = 4;
  static Raw set1(int32_t v) { return _mm_set1_epi32(v); }
  static Raw min(Raw a, Raw b) {
    Raw lt = _mm_cmplt_epi32(a, b);
    return _mm_or_si128(_mm_and_si128(lt, a), _mm_andnot_si128(lt, b));
  }
  static Raw max(Raw a, Raw b) {
    Raw gt = _mm_cmpgt_epi32(a, b);
    return _mm_or_si128(_mm_and_si128(gt, a), _mm_andnot_si128(gt, b));
  }
};

template <> struct Vec<float> {
  using Raw = __m128;
  static constexpr int kLanes = 4;
  static Raw loadu(const void* p) { return _mm_loadu_ps(static_cast<const float*>(p)); }
  static Raw load(const void* p) { return _mm_load_ps(static_cast<const float*>(p)); }
  static void storeu(void* p, Raw v) { _mm_storeu_ps(static_cast<float*>(p), v); }
  static void store(void* p, Raw v) { _mm_store_ps(static_cast<float*>(p), v); }
  static void stream(void* p, Raw v) { _mm_stream_ps(static_cast<float*>(p), v); }
  static Raw set1(float v) { return _mm_set1_ps(v); }
  static Raw min(Raw a, Raw b) { return _mm_min_ps(a, b); }
  static Raw max(Raw a, Raw b) { return _mm_max_ps(a, b); }
  static Raw add(Raw a, Raw b) { return _mm_add_ps(a, b); }
  static Raw sub(Raw a, Raw b) { return _mm_sub_ps(a, b); }
  static Raw mul(Raw a, Raw b) { return _mm_mul_ps(a, b); }
  // The sign bit cleared.
  static Raw abs(Raw a) { return _mm_andnot_ps(_mm_set1_ps(-0.0f), a); }
};

// Elements to process one by one before `p` reaches a 16-byte boundary
// (capped at n).
template <typename T>
inline int elementsToAlignment(const T* p, int n) {
  int misalignment = static_cast<int>(reinterpret_cast<uintptr_t>(p) & (kBytes - 1));
  int head = misalignment == 0 ? 0 : (kBytes - misalignment) / static_cast<int>(sizeof(T));
  // A pointer not aligned to its own element size never reaches the boundary.
  if (misalignment % static_cast<int>(sizeof(T)) != 0) head = n;
  return head < n ? head : n;
}

// Makes non-temporal stores visible before returning to the caller.
inline void storeFence() { _mm_sfence(); }

}  // namespace simd
}  // namespace zelcv

#endif  // ZELCV_KERNELS_SIMD_H
