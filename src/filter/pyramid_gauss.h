// The Gaussian 5x5 pyramid pair. Each source row is filtered horizontally
// once into a small ring of intermediate rows in the work buffer (16-bit sums
// for the 8-bit types, floats for 32f); each destination row then combines
// rows of the ring through the row driver. The scalar expressions below are
// the definition; the SSE2 forms compute the same expressions (integer sums
// are exact, float sums keep the order), so every path gives the same bits.
#ifndef ZELCV_FILTER_PYRAMID_GAUSS_H
#define ZELCV_FILTER_PYRAMID_GAUSS_H

#include <emmintrin.h>
#include <stddef.h>
#include <stdint.h>

#include <type_traits>

#include "core/alloc.h"
#include "filter/border.h"
#include "kernels/row_driver.h"

namespace zelcv {
namespace pyr {

// Intermediate element: 16 bits hold every 8-bit row sum (at most 16 x 255)
// and, taken modulo 2^16, every column sum before the final shift.
template <typename T>
using Mid = typename std::conditional<std::is_same<T, float>::value, float, int16_t>::type;

template <typename T>
using Wide = typename std::conditional<std::is_same<T, float>::value, float, int>::type;

// (a + e) + (b + d) * 4 + c * 6: the binomial 5-tap sum.
template <typename W>
inline W sum5(W a, W b, W c, W d, W e) {
  return (a + e) + (b + d) * W(4) + c * W(6);
}
// (a + c) + b * 6 and (b + c) * 4: the two phases of the 3-tap expansion.
template <typename W>
inline W evenUp(W a, W b, W c) {
  return (a + c) + b * W(6);
}
template <typename W>
inline W oddUp(W b, W c) {
  return (b + c) * W(4);
}

// Final conversions of 256ths (down) and 64ths (up).
template <typename T>
inline T finishDown(Wide<T> sum) {
  if constexpr (std::is_same<T, float>::value)
    return sum * (1.0f / 256.0f);
  else
    return T((sum + 128) >> 8);
}
template <typename T>
inline T finishUp(Wide<T> sum) {
  if constexpr (std::is_same<T, float>::value)
    return sum * (1.0f / 64.0f);
  else
    return T((sum + 32) >> 6);
}

// ---- SSE2 helpers for the 8-bit types -------------------------------------

// The even and odd bytes of 16 as 16-bit lanes, widened by the type's sign.
template <typename T>
inline void splitEvenOdd(__m128i v, __m128i& even, __m128i& odd) {
  if constexpr (std::is_same<T, uint8_t>::value) {
    even = _mm_and_si128(v, _mm_set1_epi16(0xFF));
    odd = _mm_srli_epi16(v, 8);
  } else {
    even = _mm_srai_epi16(_mm_slli_epi16(v, 8), 8);
    odd = _mm_srai_epi16(v, 8);
  }
}
// Eight bytes widened to 16-bit lanes.
template <typename T>
inline __m128i widen8(const T* p) {
  __m128i v = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(p));
  if constexpr (std::is_same<T, uint8_t>::value)
    return _mm_unpacklo_epi8(v, _mm_setzero_si128());
  else
    return _mm_srai_epi16(_mm_unpacklo_epi8(v, v), 8);
}
inline __m128i times4(__m128i v) { return _mm_slli_epi16(v, 2); }
inline __m128i times6(__m128i v) { return _mm_add_epi16(_mm_slli_epi16(v, 2), _mm_slli_epi16(v, 1)); }
template <typename T>
inline __m128i shiftDown(__m128i v) {
  return std::is_same<T, uint8_t>::value ? _mm_srli_epi16(v, 8) : _mm_srai_epi16(v, 8);
}
template <typename T>
inline __m128i shiftUp(__m128i v) {
  return std::is_same<T, uint8_t>::value ? _mm_srli_epi16(v, 6) : _mm_srai_epi16(v, 6);
}
template <typename T>
inline __m128i pack16(__m128i lo, __m128i hi) {
  return std::is_same<T, uint8_t>::value ? _mm_packus_epi16(lo, hi) : _mm_packs_epi16(lo, hi);
}

// ---- Horizontal passes -----------------------------------------------------

// One source row of `width` pixels into (width + 1) / 2 filtered pixels.
template <typename T, int kCh>
void rowDown(const T* s, int width, Mid<T>* m) {
  using W = Wide<T>;
  const int outWidth = (width + 1) / 2;
  auto px = [&](int pos, int c) { return W(s[borderIndex(pos, width, zelBorderMirror) * kCh + c]); };
  auto edge = [&](int i) {
    for (int c = 0; c < kCh; ++c)
      m[i * kCh + c] = Mid<T>(sum5(px(2 * i - 2, c), px(2 * i - 1, c), px(2 * i, c), px(2 * i + 1, c), px(2 * i + 2, c)));
  };
  // Outputs 1 .. last read only pixels inside the row.
  const int last = (width - 3) / 2;
  edge(0);
  int i = 1;
  if constexpr (!std::is_same<T, float>::value && kCh == 1) {
    // Eight outputs read pixels 2i - 2 .. 2i + 17.
    for (; i + 7 <= last && 2 * i + 17 < width; i += 8) {
      const T* p = s + 2 * i - 2;
      __m128i a, b, c, d, e, unused;
      splitEvenOdd<T>(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p)), a, b);
      splitEvenOdd<T>(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p + 2)), c, d);
      splitEvenOdd<T>(_mm_loadu_si128(reinterpret_cast<const __m128i*>(p + 4)), e, unused);
      __m128i h = _mm_add_epi16(_mm_add_epi16(_mm_add_epi16(a, e), times4(_mm_add_epi16(b, d))), times6(c));
      _mm_storeu_si128(reinterpret_cast<__m128i*>(m + i), h);
    }
  }
  if constexpr (std::is_same<T, float>::value && kCh == 1) {
    // Four outputs read pixels 2i - 2 .. 2i + 9; even and odd lanes by shuffles.
    auto even = [](const float* p) {
      return _mm_shuffle_ps(_mm_loadu_ps(p), _mm_loadu_ps(p + 4), _MM_SHUFFLE(2, 0, 2, 0));
    };
    auto odd = [](const float* p) {
      return _mm_shuffle_ps(_mm_loadu_ps(p), _mm_loadu_ps(p + 4), _MM_SHUFFLE(3, 1, 3, 1));
    };
    for (; i + 3 <= last && 2 * i + 9 < width; i += 4) {
      const float* p = s + 2 * i - 2;
      const __m128 a = even(p), b = odd(p), c = even(p + 2), d = odd(p + 2), e = even(p + 4);
      const __m128 h = _mm_add_ps(_mm_add_ps(_mm_add_ps(a, e), _mm_mul_ps(_mm_add_ps(b, d), _mm_set1_ps(4.0f))),
                                  _mm_mul_ps(c, _mm_set1_ps(6.0f)));
      _mm_storeu_ps(m + i, h);
    }
  }
  if constexpr (!std::is_same<T, float>::value && kCh == 3) {
    // Two outputs per vector: a 16-byte load at pixel 2i + d holds the tap's
    // pixels for outputs i (bytes 0..2) and i + 1 (bytes 6..8); they are
    // joined into bytes 0..5 and widened. Outputs i, i + 1 read pixels up to
    // 2i + 4, and the load up to byte 6i + 21.
    const __m128i low3 = _mm_set_epi32(0, 0, 0, 0x00FFFFFF),
                  next3 = _mm_set_epi32(0, 0, 0xFFFF, int(0xFF000000u));
    auto tap = [&](const T* q) {
      const __m128i t = _mm_loadu_si128(reinterpret_cast<const __m128i*>(q));
      const __m128i joined = _mm_or_si128(_mm_and_si128(t, low3), _mm_and_si128(_mm_srli_si128(t, 3), next3));
      if constexpr (std::is_same<T, uint8_t>::value)
        return _mm_unpacklo_epi8(joined, _mm_setzero_si128());
      else
        return _mm_srai_epi16(_mm_unpacklo_epi8(joined, joined), 8);
    };
    for (; i + 1 <= last && 6 * i + 21 < 3 * width; i += 2) {
      const T* q = s + 6 * i;
      const __m128i a = tap(q - 6), b = tap(q - 3), c = tap(q), d = tap(q + 3), e = tap(q + 6);
      const __m128i h = _mm_add_epi16(_mm_add_epi16(_mm_add_epi16(a, e), times4(_mm_add_epi16(b, d))), times6(c));
      // Lanes 6 and 7 spill into the next output, written next or by the edge.
      _mm_storeu_si128(reinterpret_cast<__m128i*>(m + 3 * i), h);
    }
  }
  for (; i <= last; ++i) {
    const T* p = s + 2 * i * kCh;
    for (int c = 0; c < kCh; ++c)
      m[i * kCh + c] = Mid<T>(sum5(W(p[c - 2 * kCh]), W(p[c - kCh]), W(p[c]), W(p[c + kCh]), W(p[c + 2 * kCh])));
  }
  for (i = i > 1 ? i : 1; i < outWidth; ++i) edge(i);
}

// One source row of `width` pixels into 2 x width expanded pixels: x[-1]
// reflects, x[width] replicates.
template <typename T, int kCh>
void rowUp(const T* s, int width, Mid<T>* u) {
  using W = Wide<T>;
  auto edge = [&](int k) {
    const int left = borderIndex(k - 1, width, zelBorderMirror);
    const int right = borderIndex(k + 1, width, zelBorderReplicate);
    for (int c = 0; c < kCh; ++c) {
      const W a = W(s[left * kCh + c]), b = W(s[k * kCh + c]), d = W(s[right * kCh + c]);
      u[2 * k * kCh + c] = Mid<T>(evenUp(a, b, d));
      u[(2 * k + 1) * kCh + c] = Mid<T>(oddUp(b, d));
    }
  };
  edge(0);
  int k = 1;
  if constexpr (!std::is_same<T, float>::value && kCh == 1) {
    // Eight pixels read k - 1 .. k + 8.
    for (; k + 9 <= width - 1; k += 8) {
      const __m128i a = widen8(s + k - 1), b = widen8(s + k), d = widen8(s + k + 1);
      const __m128i even = _mm_add_epi16(_mm_add_epi16(a, d), times6(b));
      const __m128i odd = times4(_mm_add_epi16(b, d));
      _mm_storeu_si128(reinterpret_cast<__m128i*>(u + 2 * k), _mm_unpacklo_epi16(even, odd));
      _mm_storeu_si128(reinterpret_cast<__m128i*>(u + 2 * k + 8), _mm_unpackhi_epi16(even, odd));
    }
  }
  for (; k < width - 1; ++k) {
    const T* p = s + k * kCh;
    Mid<T>* o = u + 2 * k * kCh;
    for (int c = 0; c < kCh; ++c) {
      const W a = W(p[c - kCh]), b = W(p[c]), d = W(p[c + kCh]);
      o[c] = Mid<T>(evenUp(a, b, d));
      o[kCh + c] = Mid<T>(oddUp(b, d));
    }
  }
  if (width > 1) edge(width - 1);
}

// ---- Vertical passes (rows for the row driver) ----------------------------

// Destination row = finishDown(sum5 of five intermediate rows).
template <typename T>
struct DownColumns {
  T* out;
  const Mid<T>* r[5];
  static constexpr int kBlock = std::is_same<T, float>::value ? 4 : 16;
  static constexpr int kPart = kBlock;
  const T* written() const { return out; }
  void one(int x) {
    using W = Wide<T>;
    out[x] = finishDown<T>(sum5(W(r[0][x]), W(r[1][x]), W(r[2][x]), W(r[3][x]), W(r[4][x])));
  }
  template <StoreMode M>
  void block(int x) {
    if constexpr (std::is_same<T, float>::value) {
      __m128 v[5];
      for (int k = 0; k < 5; ++k) v[k] = _mm_loadu_ps(r[k] + x);
      __m128 s = _mm_add_ps(_mm_add_ps(_mm_add_ps(v[0], v[4]), _mm_mul_ps(_mm_add_ps(v[1], v[3]), _mm_set1_ps(4.0f))),
                            _mm_mul_ps(v[2], _mm_set1_ps(6.0f)));
      simd::put<M, simd::Vec<float>>(out + x, _mm_mul_ps(s, _mm_set1_ps(1.0f / 256.0f)));
    } else {
      __m128i half[2];
      for (int h = 0; h < 2; ++h) {
        __m128i v[5];
        for (int k = 0; k < 5; ++k) v[k] = _mm_loadu_si128(reinterpret_cast<const __m128i*>(r[k] + x + 8 * h));
        __m128i s = _mm_add_epi16(_mm_add_epi16(_mm_add_epi16(v[0], v[4]), times4(_mm_add_epi16(v[1], v[3]))), times6(v[2]));
        half[h] = shiftDown<T>(_mm_add_epi16(s, _mm_set1_epi16(128)));
      }
      simd::put<M, simd::Vec<uint8_t>>(out + x, pack16<T>(half[0], half[1]));
    }
  }
  template <StoreMode M>
  void part(int x) {
    block<M>(x);
  }
};

// Destination row of the expansion: even rows (a + c) + b * 6, odd rows
// (b + c) * 4, over the intermediate rows a, b, c.
template <typename T>
struct UpColumns {
  T* out;
  const Mid<T>* a;
  const Mid<T>* b;
  const Mid<T>* c;
  bool odd;
  static constexpr int kBlock = std::is_same<T, float>::value ? 4 : 16;
  static constexpr int kPart = kBlock;
  const T* written() const { return out; }
  void one(int x) {
    using W = Wide<T>;
    out[x] = finishUp<T>(odd ? oddUp(W(b[x]), W(c[x])) : evenUp(W(a[x]), W(b[x]), W(c[x])));
  }
  template <StoreMode M>
  void block(int x) {
    if constexpr (std::is_same<T, float>::value) {
      const __m128 vb = _mm_loadu_ps(b + x), vc = _mm_loadu_ps(c + x);
      const __m128 s = odd ? _mm_mul_ps(_mm_add_ps(vb, vc), _mm_set1_ps(4.0f))
                           : _mm_add_ps(_mm_add_ps(_mm_loadu_ps(a + x), vc), _mm_mul_ps(vb, _mm_set1_ps(6.0f)));
      simd::put<M, simd::Vec<float>>(out + x, _mm_mul_ps(s, _mm_set1_ps(1.0f / 64.0f)));
    } else {
      __m128i half[2];
      for (int h = 0; h < 2; ++h) {
        const int i = x + 8 * h;
        const __m128i vb = _mm_loadu_si128(reinterpret_cast<const __m128i*>(b + i));
        const __m128i vc = _mm_loadu_si128(reinterpret_cast<const __m128i*>(c + i));
        const __m128i s =
            odd ? times4(_mm_add_epi16(vb, vc))
                : _mm_add_epi16(_mm_add_epi16(_mm_loadu_si128(reinterpret_cast<const __m128i*>(a + i)), vc), times6(vb));
        half[h] = shiftUp<T>(_mm_add_epi16(s, _mm_set1_epi16(32)));
      }
      simd::put<M, simd::Vec<uint8_t>>(out + x, pack16<T>(half[0], half[1]));
    }
  }
  template <StoreMode M>
  void part(int x) {
    block<M>(x);
  }
};

// ---- Whole images ----------------------------------------------------------

// Bytes of one intermediate row in the work buffer, as the queries size it.
inline size_t downRowBytes(int width, int channels) { return size_t((int64_t(width) * 4 * channels + 15) >> 4) * 16; }
inline size_t upRowBytes(int width, int channels) { return size_t((int64_t(width) * 8 * channels + 15) >> 4) * 16; }

template <typename T>
inline const T* rowAt(const T* base, int step, int y) {
  return reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(base) + ptrdiff_t(step) * y);
}
template <typename T>
inline T* rowAt(T* base, int step, int y) {
  return reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(base) + ptrdiff_t(step) * y);
}

// A ring of intermediate rows in the buffer, each filled once per source row.
template <typename M>
struct RowRing {
  uint8_t* base;
  size_t rowBytes;
  int slots;
  int tag[6];
  template <typename Fill>
  const M* get(int row, Fill fill) {
    const int slot = row % slots;
    M* p = reinterpret_cast<M*>(base + rowBytes * slot);
    if (tag[slot] != row) {
      fill(row, p);
      tag[slot] = row;
    }
    return p;
  }
};

// Three-channel 8-bit reduction, columns first: each destination row sums
// its five source rows into one row of 16-bit column sums, then filters that
// row once at the even pixels. (Filtering rows first would filter every
// source row at the decimated positions, twice the work for three channels,
// whose even pixels do not fall on vector lanes.) Integer sums are exact, so
// the order of the passes does not change a bit.
template <typename T>
void pyrDownC3(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, uint8_t* buffer) {
  const int width = roi.width, height = roi.height;
  const int outWidth = (width + 1) / 2, outHeight = (height + 1) / 2, n = 3 * width;
  const int last = (width - 3) / 2;  // outputs 1 .. last read only pixels inside the row
  int16_t* v = reinterpret_cast<int16_t*>(alignUp(buffer, 64));
  const __m128i keep3 = _mm_set_epi32(0, 0, 0xFFFF, -1);
  for (int j = 0; j < outHeight; ++j) {
    const T* r[5];
    for (int k = 0; k < 5; ++k) r[k] = rowAt(src, srcStep, borderIndex(2 * j - 2 + k, height, zelBorderMirror));
    int e = 0;
    for (; e + 8 <= n; e += 8) {
      const __m128i s = _mm_add_epi16(
          _mm_add_epi16(_mm_add_epi16(widen8(r[0] + e), widen8(r[4] + e)),
                        times4(_mm_add_epi16(widen8(r[1] + e), widen8(r[3] + e)))),
          times6(widen8(r[2] + e)));
      _mm_storeu_si128(reinterpret_cast<__m128i*>(v + e), s);
    }
    for (; e < n; ++e) v[e] = int16_t(sum5(int(r[0][e]), int(r[1][e]), int(r[2][e]), int(r[3][e]), int(r[4][e])));
    T* d = rowAt(dst, dstStep, j);
    auto px = [&](int pos, int c) { return int(v[borderIndex(pos, width, zelBorderMirror) * 3 + c]); };
    auto edge = [&](int i) {
      for (int c = 0; c < 3; ++c)
        d[3 * i + c] =
            finishDown<T>(sum5(px(2 * i - 2, c), px(2 * i - 1, c), px(2 * i, c), px(2 * i + 1, c), px(2 * i + 2, c)));
    };
    edge(0);
    int i = 1;
    // Outputs i and i + 1 in lanes 0..2 and 3..5: each tap joins the pixel of
    // output i with the one two pixels on, which output i + 1 needs. The loads
    // reach element 6i + 19; the 8-byte store writes two bytes of output
    // i + 2, which a later step writes again.
    for (; i + 1 <= last && 6 * i + 19 < n && 3 * i + 8 <= 3 * outWidth; i += 2) {
      __m128i q[7];
      for (int k = 0; k < 7; ++k)
        q[k] = _mm_and_si128(_mm_loadu_si128(reinterpret_cast<const __m128i*>(v + 3 * (2 * i - 2 + k))), keep3);
      __m128i t[5];
      for (int k = 0; k < 5; ++k) t[k] = _mm_or_si128(q[k], _mm_slli_si128(q[k + 2], 6));
      const __m128i s =
          _mm_add_epi16(_mm_add_epi16(_mm_add_epi16(t[0], t[4]), times4(_mm_add_epi16(t[1], t[3]))), times6(t[2]));
      const __m128i res = shiftDown<T>(_mm_add_epi16(s, _mm_set1_epi16(128)));
      _mm_storel_epi64(reinterpret_cast<__m128i*>(d + 3 * i), pack16<T>(res, res));
    }
    for (; i <= last; ++i)
      for (int c = 0; c < 3; ++c) {
        const int16_t* p = v + 6 * i + c;
        d[3 * i + c] = finishDown<T>(sum5(int(p[-6]), int(p[-3]), int(p[0]), int(p[3]), int(p[6])));
      }
    for (; i < outWidth; ++i) edge(i);
  }
}

template <typename T, int kCh>
void pyrDown(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, uint8_t* buffer) {
  using W = Wide<T>;
  const int width = roi.width, height = roi.height;
  const int outWidth = (width + 1) / 2, outHeight = (height + 1) / 2;
  RowRing<Mid<T>> ring{alignUp(buffer, 64), downRowBytes(width, kCh), 6, {-1, -1, -1, -1, -1, -1}};
  auto fill = [&](int y, Mid<T>* m) { rowDown<T, kCh>(rowAt(src, srcStep, y), width, m); };
  const int n = outWidth * kCh;
  if constexpr (kCh == 3 && !std::is_same<T, float>::value) {
    if (height > 2) return pyrDownC3<T>(src, srcStep, dst, dstStep, roi, buffer);
  }
  if (height <= 2) {
    // Equal weights on the two rows (row 0 twice for one row): 1/32 of the sum.
    const Mid<T>* r0 = ring.get(0, fill);
    const Mid<T>* r1 = ring.get(height - 1, fill);
    for (int x = 0; x < n; ++x) {
      const W s = W(r0[x]) + W(r1[x]);
      if constexpr (std::is_same<T, float>::value)
        dst[x] = s * (1.0f / 32.0f);
      else
        dst[x] = T((s * 8 + 128) >> 8);
    }
    return;
  }
  driveRows<StoreMode::Ordinary>(n, outHeight, [&](int j) {
    DownColumns<T> row{rowAt(dst, dstStep, j), {}};
    for (int k = 0; k < 5; ++k) row.r[k] = ring.get(borderIndex(2 * j - 2 + k, height, zelBorderMirror), fill);
    return row;
  });
}

template <typename T, int kCh>
void pyrUp(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, uint8_t* buffer) {
  const int width = roi.width, height = roi.height;
  RowRing<Mid<T>> ring{alignUp(buffer, 64), upRowBytes(width, kCh), 3, {-1, -1, -1, -1, -1, -1}};
  auto fill = [&](int y, Mid<T>* u) { rowUp<T, kCh>(rowAt(src, srcStep, y), width, u); };
  driveRows<StoreMode::Ordinary>(2 * width * kCh, 2 * height, [&](int y) {
    const int k = y >> 1;
    UpColumns<T> row{rowAt(dst, dstStep, y), nullptr, nullptr, nullptr, (y & 1) != 0};
    // Fetch in ascending order so that the ring never evicts a row in use.
    row.a = ring.get(borderIndex(k - 1, height, zelBorderMirror), fill);
    row.b = ring.get(k, fill);
    row.c = ring.get(borderIndex(k + 1, height, zelBorderReplicate), fill);
    return row;
  });
}

}  // namespace pyr
}  // namespace zelcv

#endif  // ZELCV_FILTER_PYRAMID_GAUSS_H
