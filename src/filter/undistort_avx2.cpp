// The AVX2 resampling of 8u three-channel rows, eight pixels per step. Each
// pixel's two source rows are read as 8 bytes each (its two neighbours'
// channels); pixel k shares a register with pixel k + 4. The weights factor
// exactly, w = (32 - fx or fx) * (32 - fy or fy), so the sum is taken as a
// horizontal step in 16 bits (at most 32 * 255) and a vertical one in 32
// bits: the same integer, hence the same bits, as the four products of the
// baseline kernel.
#include <stddef.h>
#include <stdint.h>

#include "kernels/simd_avx2.h"

namespace zelcv {
namespace avx2 {

namespace {

constexpr int kSubBits = 5;
constexpr int kOne = 1 << kSubBits;

// Eight pixels whose neighbourhoods lie inside; `offsets` are the byte
// offsets of their top-left neighbours from `data`.
inline void blend8(const uint8_t* data, int step, __m256i offsets, __m256i fx, __m256i fy, uint8_t* out) {
  alignas(32) int32_t at[8];
  _mm256_store_si256(reinterpret_cast<__m256i*>(at), offsets);
  const __m256i one = _mm256_set1_epi32(kOne);
  // Per pixel the byte pair (32 - fx, fx) four times, and the word pair
  // (32 - fy, fy).
  const __m256i wxPair = _mm256_or_si256(_mm256_sub_epi32(one, fx), _mm256_slli_epi32(fx, 8));
  const __m256i wx = _mm256_or_si256(wxPair, _mm256_slli_epi32(wxPair, 16));
  const __m256i wy = _mm256_or_si256(_mm256_sub_epi32(one, fy), _mm256_slli_epi32(fy, 16));
  // Top row bytes 0..7 and bottom row bytes 8..15 per half: pair each
  // channel of the left neighbour with the right one's, spare bytes 0.
  const __m256i pairs = _mm256_setr_epi8(0, 3, 1, 4, 2, 5, -1, -1, 8, 11, 9, 12, 10, 13, -1, -1, 0, 3, 1, 4, 2, 5,
                                         -1, -1, 8, 11, 9, 12, 10, 13, -1, -1);
  // Words (top, bottom) per channel.
  const __m256i columns = _mm256_setr_epi8(0, 1, 8, 9, 2, 3, 10, 11, 4, 5, 12, 13, 6, 7, 14, 15, 0, 1, 8, 9, 2, 3,
                                           10, 11, 4, 5, 12, 13, 6, 7, 14, 15);
  const __m256i round = _mm256_set1_epi32(1 << (2 * kSubBits - 1));
  auto twoRows = [&](int k) {
    const uint8_t* p = data + at[k];
    return _mm_castps_si128(_mm_loadh_pi(_mm_castsi128_ps(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(p))),
                                         reinterpret_cast<const __m64*>(p + step)));
  };
  __m256i r[4];
  for (int k = 0; k < 4; ++k) {
    const __m256i v = _mm256_inserti128_si256(_mm256_castsi128_si256(twoRows(k)), twoRows(k + 4), 1);
    const __m256i pick = _mm256_setr_epi32(k, k, k, k, k + 4, k + 4, k + 4, k + 4);
    const __m256i h = _mm256_maddubs_epi16(_mm256_shuffle_epi8(v, pairs), _mm256_permutevar8x32_epi32(wx, pick));
    const __m256i sum = _mm256_madd_epi16(_mm256_shuffle_epi8(h, columns), _mm256_permutevar8x32_epi32(wy, pick));
    r[k] = _mm256_srli_epi32(_mm256_add_epi32(sum, round), 2 * kSubBits);
  }
  // Pixels 0..3 in the low half, 4..7 in the high one, four bytes each;
  // drop every fourth byte and join the halves into 24 bytes.
  const __m256i packed = _mm256_packus_epi16(_mm256_packs_epi32(r[0], r[1]), _mm256_packs_epi32(r[2], r[3]));
  const __m256i squeeze = _mm256_setr_epi8(0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, -1, -1, -1, -1, 0, 1, 2, 4, 5,
                                           6, 8, 9, 10, 12, 13, 14, -1, -1, -1, -1);
  const __m256i joined = _mm256_permutevar8x32_epi32(_mm256_shuffle_epi8(packed, squeeze),
                                                     _mm256_setr_epi32(0, 1, 2, 4, 5, 6, 3, 7));
  _mm_storeu_si128(reinterpret_cast<__m128i*>(out), _mm256_castsi256_si128(joined));
  _mm_storel_epi64(reinterpret_cast<__m128i*>(out + 16), _mm256_extracti128_si256(joined, 1));
}

}  // namespace

int remapRow8uC3(const uint8_t* data, int step, int xLimit, int yLimit, const float* mx, const float* my,
                 uint8_t* dst, int width) {
  const __m256 scale = _mm256_set1_ps(float(kOne));
  const __m256i mask = _mm256_set1_epi32(kOne - 1), minus1 = _mm256_set1_epi32(-1);
  const __m256i xl = _mm256_set1_epi32(xLimit), yl = _mm256_set1_epi32(yLimit);
  const __m256i stepV = _mm256_set1_epi32(step), three = _mm256_set1_epi32(3);
  int j = 0;
  for (; j + 8 <= width; j += 8) {
    const __m256i X = _mm256_cvtps_epi32(_mm256_mul_ps(_mm256_loadu_ps(mx + j), scale));
    const __m256i Y = _mm256_cvtps_epi32(_mm256_mul_ps(_mm256_loadu_ps(my + j), scale));
    const __m256i ix = _mm256_srai_epi32(X, kSubBits), iy = _mm256_srai_epi32(Y, kSubBits);
    const __m256i inside =
        _mm256_and_si256(_mm256_and_si256(_mm256_cmpgt_epi32(ix, minus1), _mm256_cmpgt_epi32(xl, ix)),
                         _mm256_and_si256(_mm256_cmpgt_epi32(iy, minus1), _mm256_cmpgt_epi32(yl, iy)));
    if (_mm256_movemask_epi8(inside) != -1) break;
    const __m256i offsets = _mm256_add_epi32(_mm256_mullo_epi32(iy, stepV), _mm256_mullo_epi32(ix, three));
    blend8(data, step, offsets, _mm256_and_si256(X, mask), _mm256_and_si256(Y, mask), dst + 3 * j);
  }
  return j;
}

}  // namespace avx2
}  // namespace zelcv
