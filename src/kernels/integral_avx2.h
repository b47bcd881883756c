// The AVX2 row kernel of the sums-only integral of an 8u source. Only
// integral_avx2.cpp includes it.
//
// A row runs over 32-pixel blocks in two steps. The first takes the running
// sums of each 16-pixel half block in 16-bit lanes and stages them in a small
// ring buffer; the second, some blocks later, widens them to 32 bits, adds the
// running sum before each half and the row above, and stores. Staging costs a
// store and a load per 16 pixels but saves the lane-crossing shuffles that
// reordering and broadcasting in registers would take.
#ifndef ZELCV_KERNELS_INTEGRAL_AVX2_H
#define ZELCV_KERNELS_INTEGRAL_AVX2_H

#include <stdint.h>
#include <string.h>

#include <type_traits>

#include "kernels/integral.h"
#include "kernels/simd_avx2.h"

namespace zelcv {
namespace avx2 {

// How a sum plane adds running sums to the row above: one, or eight lanes.
template <class Sum> struct SumLanes;

template <> struct SumLanes<integral::Plane32s> {
  static uint32_t one(uint32_t above, uint32_t run) { return above + run; }
  static void eight(uint32_t* out, const uint32_t* above, __m256i run) {
    __m256i a = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(above));
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(out), _mm256_add_epi32(a, run));
  }
};

// Signed conversion: exact while the running sums stay below 2^31 (the
// caller makes sure), and then the same single rounding as the scalar form.
template <> struct SumLanes<integral::Plane32f> {
  static float one(float above, uint32_t run) { return above + float(double(run)); }
  static void eight(float* out, const float* above, __m256i run) {
    _mm256_storeu_ps(out, _mm256_add_ps(_mm256_loadu_ps(above), _mm256_cvtepi32_ps(run)));
  }
};

// Stages the 16-bit running sums of the 32-pixel block at src: words 0-7
// hold pixels 0-7, words 8-15 pixels 16-23, words 16-23 pixels 8-15 and
// words 24-31 pixels 24-31, each half block counted from 0 (at most 16 x 255).
// Running sums of pixel pairs come from a shift-and-add prefix, and the even
// pixels' sums are the pair sums less the odd pixel.
inline void stageBlock(const uint8_t* src, uint16_t* staged) {
  __m256i v = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(src));
  __m256i pairs = _mm256_maddubs_epi16(v, _mm256_set1_epi8(1));
  __m256i odd = _mm256_maddubs_epi16(v, _mm256_set1_epi16(0x0100));
  pairs = _mm256_add_epi16(pairs, _mm256_slli_si256(pairs, 2));
  pairs = _mm256_add_epi16(pairs, _mm256_slli_si256(pairs, 4));
  pairs = _mm256_add_epi16(pairs, _mm256_slli_si256(pairs, 8));
  __m256i even = _mm256_sub_epi16(pairs, odd);
  _mm256_store_si256(reinterpret_cast<__m256i*>(staged), _mm256_unpacklo_epi16(even, pairs));
  _mm256_store_si256(reinterpret_cast<__m256i*>(staged + 16), _mm256_unpackhi_epi16(even, pairs));
}

inline __m256i widenStaged(const uint16_t* p) {
  return _mm256_cvtepu16_epi32(_mm_load_si128(reinterpret_cast<const __m128i*>(p)));
}

// A staged sum broadcast to eight 32-bit lanes through a plain 32-bit load:
// the word at p[0] (the low half) or, with `high`, the word at p[1].
inline __m256i broadcastWord(const uint16_t* p, bool high) {
  int32_t pair;
  memcpy(&pair, p, 4);
  __m256i v = _mm256_set1_epi32(pair);
  return high ? _mm256_srli_epi32(v, 16) : _mm256_and_si256(v, _mm256_set1_epi32(0xFFFF));
}

// Writes the 32 outputs of a staged block: the staged sums widened, plus the
// running sum before each half block (`carry` in, the sum after it out), plus
// the row above.
template <class Sum>
inline void finishBlock(const uint16_t* staged, const typename Sum::T* above, typename Sum::T* out,
                        __m256i& carry) {
  __m256i half = _mm256_add_epi32(carry, broadcastWord(staged + 23, false));
  __m256i next = _mm256_add_epi32(half, broadcastWord(staged + 30, true));
  SumLanes<Sum>::eight(out, above, _mm256_add_epi32(widenStaged(staged), carry));
  SumLanes<Sum>::eight(out + 8, above + 8, _mm256_add_epi32(widenStaged(staged + 16), carry));
  SumLanes<Sum>::eight(out + 16, above + 16, _mm256_add_epi32(widenStaged(staged + 8), half));
  SumLanes<Sum>::eight(out + 24, above + 24, _mm256_add_epi32(widenStaged(staged + 24), half));
  carry = next;
}

// Blocks are staged this far ahead of the block being finished, so that the
// loads never wait on the stores that staged them; the ring holds the blocks
// in between (a power of two).
constexpr int kStageAhead = 8;
constexpr int kRingBlocks = 16;

// Output elements ahead of the block being finished whose lines are fetched
// for writing (8 KB): a destination that is not in the cache otherwise holds
// the stores back while each line arrives. Prefetches past the image are
// harmless.
constexpr int kWriteAhead = 2048;

template <class Sum>
void sumRowKernel(Isa, Sum, const uint8_t* src, const typename Sum::T* above, typename Sum::T* out, int w) {
  uint32_t run = 0;
  int x = 0;
  // A float plane converts lanes as signed: see SumLanes<Plane32f>.
  if (!std::is_same<Sum, integral::Plane32f>::value || w <= 8421504) {
    alignas(32) uint16_t ring[kRingBlocks * 32];
    auto slot = [&](int block) { return ring + 32 * (block % kRingBlocks); };
    const int blocks = w / 32;
    for (int b = 0; b < kStageAhead && b < blocks; ++b) stageBlock(src + 32 * b, slot(b));
    __m256i carry = _mm256_setzero_si256();
    int b = 0;
    for (; b + kStageAhead < blocks; ++b) {
      stageBlock(src + 32 * (b + kStageAhead), slot(b + kStageAhead));
      finishBlock<Sum>(slot(b), above + 32 * b, out + 32 * b, carry);
      const uintptr_t ahead = uintptr_t(out + 32 * b) + kWriteAhead * sizeof(typename Sum::T);
      __builtin_prefetch(reinterpret_cast<const void*>(ahead), 1);
      __builtin_prefetch(reinterpret_cast<const void*>(ahead + 64), 1);
    }
    for (; b < blocks; ++b) finishBlock<Sum>(slot(b), above + 32 * b, out + 32 * b, carry);
    run = uint32_t(_mm256_cvtsi256_si32(carry));
    x = 32 * blocks;
  }
  for (; x < w; ++x) {
    run += src[x];
    out[x] = SumLanes<Sum>::one(above[x], run);
  }
}

}  // namespace avx2
}  // namespace zelcv

#endif  // ZELCV_KERNELS_INTEGRAL_AVX2_H
