// Row kernels of the integral images: each builds one output row from the
// source row and the output row(s) above it. Every kernel has a scalar
// reference (the definition of the result) and an SSE2 path that must give
// bit-identical results; the unit tests hold them against each other. The
// sums-only rows also have an AVX2 form (integral_avx2.h), chosen per call.
#ifndef ZELCV_KERNELS_INTEGRAL_H
#define ZELCV_KERNELS_INTEGRAL_H

#include <emmintrin.h>
#include <stdint.h>
#include <string.h>

#include <type_traits>

#include "kernels/simd.h"

namespace zelcv {
namespace integral {

// ---- Element conversions shared by both paths ------------------------------

// Correctly rounded: uint32 -> double is exact, the one rounding is to float.
inline float toFloat(uint32_t v) { return float(double(v)); }
inline double toDouble(uint32_t v) { return double(v); }

inline __m128i load4Bytes(const uint8_t* p) {
  int32_t v;
  memcpy(&v, p, 4);
  return _mm_cvtsi32_si128(v);
}
// Four bytes widened to four 32-bit lanes.
inline __m128i widen4(const uint8_t* p) {
  const __m128i zero = _mm_setzero_si128();
  return _mm_unpacklo_epi16(_mm_unpacklo_epi8(load4Bytes(p), zero), zero);
}
// Unsigned 32-bit lanes 0 and 1 to double (exact).
inline __m128d unsignedLowToDouble(__m128i v) {
  const __m128i bias = _mm_set1_epi32(int32_t(0x80000000u));
  return _mm_add_pd(_mm_cvtepi32_pd(_mm_xor_si128(v, bias)), _mm_set1_pd(2147483648.0));
}
inline __m128i highHalf(__m128i v) { return _mm_shuffle_epi32(v, 0xEE); }
inline __m128i lastLane(__m128i v) { return _mm_shuffle_epi32(v, 0xFF); }
inline __m128i prefix4(__m128i v) {
  v = _mm_add_epi32(v, _mm_slli_si128(v, 4));
  return _mm_add_epi32(v, _mm_slli_si128(v, 8));
}

// ---- Plain integral rows ----------------------------------------------------

// Output planes of a plain integral. The sum plane takes the row's running
// sum r (a wrapping 32-bit integer), the squares plane the running sum q of
// the squares; each adds it to the element above.
struct Plane32s {
  using T = uint32_t;
  static T add(T above, uint32_t run) { return above + run; }
  // Four lanes of running sums (as unsigned 32-bit) added to the row above.
  static void store4(T* out, const T* above, __m128i run) {
    __m128i a = _mm_loadu_si128(reinterpret_cast<const __m128i*>(above));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out), _mm_add_epi32(a, run));
  }
  static constexpr bool kSignedConversionExact = true;
};

struct Plane32f {
  using T = float;
  static T add(T above, uint32_t run) { return above + toFloat(run); }
  // Only valid while every running sum is below 2^31 (the caller decides).
  static void store4(T* out, const T* above, __m128i run) {
    _mm_storeu_ps(out, _mm_add_ps(_mm_loadu_ps(above), _mm_cvtepi32_ps(run)));
  }
  static constexpr bool kSignedConversionExact = false;
};

struct Plane64f {
  using T = double;
  static T add(T above, uint32_t run) { return above + toDouble(run); }
  static void store4(T* out, const T* above, __m128i run) {
    _mm_storeu_pd(out, _mm_add_pd(_mm_loadu_pd(above), unsignedLowToDouble(run)));
    _mm_storeu_pd(out + 2, _mm_add_pd(_mm_loadu_pd(above + 2), unsignedLowToDouble(highHalf(run))));
  }
  static constexpr bool kSignedConversionExact = true;
};

// No squares plane (plain Integral).
struct NoPlane {
  using T = uint8_t;
  static void store4(T*, const T*, __m128i) {}
};

// out[x] = above[x] + (sum of src[0..x]) for x in [0, w), and the same for
// the squares when Sq is a plane. `run` and `runSq` carry the running sums in
// and out (so that a vector head and a scalar tail can share one row).
template <class Sum, class Sq>
inline void integralRowScalar(const uint8_t* src, const typename Sum::T* above, typename Sum::T* out,
                              const typename Sq::T* aboveSq, typename Sq::T* outSq, int from, int w,
                              uint32_t& run, uint32_t& runSq) {
  for (int x = from; x < w; ++x) {
    uint32_t v = src[x];
    run += v;
    out[x] = Sum::add(above[x], run);
    if constexpr (!std::is_same<Sq, NoPlane>::value) {
      runSq += v * v;
      outSq[x] = Sq::add(aboveSq[x], runSq);
    }
  }
}

// Sixteen pixels per step. The prefix sums run over the eight pairs of
// neighbouring pixels (16-bit lanes hold up to 16 x 255), which needs half
// the shifts of a per-pixel prefix; the even pixels' prefix is the pair
// prefix less the odd pixel. The block's offset `carry` is broadcast from its
// last lane. Returns where it stopped; the scalar kernel finishes the row.
template <class Sum, class Sq>
inline int integralRowSimd(const uint8_t* src, const typename Sum::T* above, typename Sum::T* out,
                           const typename Sq::T* aboveSq, typename Sq::T* outSq, int from, int w,
                           uint32_t& run, uint32_t& runSq) {
  const __m128i zero = _mm_setzero_si128();
  const __m128i lowBytes = _mm_set1_epi16(0x00FF);
  __m128i carry = _mm_set1_epi32(int32_t(run));
  __m128i carrySq = _mm_set1_epi32(int32_t(runSq));
  int x = from;
  for (; x + 16 <= w; x += 16) {
    __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(src + x));
    if constexpr (!std::is_same<Sq, NoPlane>::value) {
      __m128i lo = _mm_unpacklo_epi8(v, zero), hi = _mm_unpackhi_epi8(v, zero);
      __m128i q[4] = {_mm_unpacklo_epi16(lo, zero), _mm_unpackhi_epi16(lo, zero),
                      _mm_unpacklo_epi16(hi, zero), _mm_unpackhi_epi16(hi, zero)};
      for (int k = 0; k < 4; ++k) {
        __m128i s = _mm_add_epi32(prefix4(_mm_madd_epi16(q[k], q[k])), carrySq);
        Sq::store4(outSq + x + 4 * k, aboveSq + x + 4 * k, s);
        carrySq = lastLane(s);
      }
    }
    __m128i odd = _mm_srli_epi16(v, 8);
    __m128i pairs = _mm_add_epi16(_mm_and_si128(v, lowBytes), odd);
    pairs = _mm_add_epi16(pairs, _mm_slli_si128(pairs, 2));
    pairs = _mm_add_epi16(pairs, _mm_slli_si128(pairs, 4));
    pairs = _mm_add_epi16(pairs, _mm_slli_si128(pairs, 8));
    __m128i evenPrefix = _mm_sub_epi16(pairs, odd);
    __m128i lo = _mm_unpacklo_epi16(evenPrefix, pairs);  // pixels 0..7
    __m128i hi = _mm_unpackhi_epi16(evenPrefix, pairs);  // pixels 8..15
    __m128i p0 = _mm_add_epi32(_mm_unpacklo_epi16(lo, zero), carry);
    __m128i p1 = _mm_add_epi32(_mm_unpackhi_epi16(lo, zero), carry);
    __m128i p2 = _mm_add_epi32(_mm_unpacklo_epi16(hi, zero), carry);
    __m128i p3 = _mm_add_epi32(_mm_unpackhi_epi16(hi, zero), carry);
    Sum::store4(out + x, above + x, p0);
    Sum::store4(out + x + 4, above + x + 4, p1);
    Sum::store4(out + x + 8, above + x + 8, p2);
    Sum::store4(out + x + 12, above + x + 12, p3);
    carry = lastLane(p3);
  }
  run = uint32_t(_mm_cvtsi128_si32(carry));
  runSq = uint32_t(_mm_cvtsi128_si32(carrySq));
  return x;
}

// One row of a plain integral of an 8u source; `useSimd` false runs the
// scalar reference alone.
template <class Sum, class Sq>
inline void integralRow(const uint8_t* src, const typename Sum::T* above, typename Sum::T* out,
                        const typename Sq::T* aboveSq, typename Sq::T* outSq, int w, bool useSimd) {
  uint32_t run = 0, runSq = 0;
  int done = 0;
  // A float plane converts lanes as signed: exact only while sums stay below
  // 2^31, which a row narrower than 2^31 / 255 guarantees.
  if (useSimd && (Sum::kSignedConversionExact || w <= 8421504))
    done = integralRowSimd<Sum, Sq>(src, above, out, aboveSq, outSq, 0, w, run, runSq);
  integralRowScalar<Sum, Sq>(src, above, out, aboveSq, outSq, done, w, run, runSq);
}

// One row of a sums-only integral of an 8u source for the instruction set
// Isa; the same results bit for bit whichever set runs. The forms per set are
// overloads of sumRowKernel on the set's tag (the AVX2 one, in namespace avx2,
// is found through its tag).
template <class Sum>
inline void sumRowKernel(simd::Sse2, Sum, const uint8_t* src, const typename Sum::T* above,
                         typename Sum::T* out, int w) {
  integralRow<Sum, NoPlane>(src, above, out, nullptr, nullptr, w, true);
}

template <class Sum, class Isa>
void sumRow(const uint8_t* src, const typename Sum::T* above, typename Sum::T* out, int w) {
  sumRowKernel(Isa(), Sum(), src, above, out, w);
}

#define ZELCV_INTEGRAL_SUM_ROW(Sum, Isa) \
  void sumRow<Sum, Isa>(const uint8_t* src, const Sum::T* above, Sum::T* out, int w)
// Built in integral_avx2.cpp.
extern template ZELCV_INTEGRAL_SUM_ROW(Plane32s, avx2::Isa);
extern template ZELCV_INTEGRAL_SUM_ROW(Plane32f, avx2::Isa);

// One row of the integral of a 32f source: the running sum is kept in single
// precision, strictly left to right, so it stays scalar; the addition of the
// row above is vectorised in a second pass over the row (still in L1).
inline void integralRow32f(const float* src, const float* above, float* out, int w, bool useSimd) {
  float run = 0.0f;
  if (!useSimd) {
    for (int x = 0; x < w; ++x) {
      run += src[x];
      out[x] = above[x] + run;
    }
    return;
  }
  for (int x = 0; x < w; ++x) {
    run += src[x];
    out[x] = run;
  }
  int x = 0;
  for (; x + 4 <= w; x += 4)
    _mm_storeu_ps(out + x, _mm_add_ps(_mm_loadu_ps(above + x), _mm_loadu_ps(out + x)));
  for (; x < w; ++x) out[x] = above[x] + out[x];
}

// ---- Tilted integral rows ----------------------------------------------------

// A tilted plane computes n[x] = p[x-1] - pp[x] + p[x+1] + a + b, with a and
// b the pixel terms src[x-1] and src[x] (or their squares).
struct Tilt32s {
  using T = uint32_t;
  static T cell(T pl, T pp, T pr, uint32_t a, uint32_t b) { return pl - pp + pr + a + b; }
  static void cell4(T* n, const T* pl, const T* pp, const T* pr, __m128i a, __m128i b) {
    auto ld = [](const T* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p)); };
    __m128i v = _mm_add_epi32(_mm_sub_epi32(ld(pl), ld(pp)), ld(pr));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(n), _mm_add_epi32(_mm_add_epi32(v, a), b));
  }
};

// Floating planes: left to right in double precision, one rounding at the end.
inline __m128d tiltCellPd(__m128d pl, __m128d pp, __m128d pr, __m128d a, __m128d b) {
  return _mm_add_pd(_mm_add_pd(_mm_add_pd(_mm_sub_pd(pl, pp), pr), a), b);
}

struct Tilt32f {
  using T = float;
  static T cell(T pl, T pp, T pr, uint32_t a, uint32_t b) {
    return float(double(pl) - double(pp) + double(pr) + double(a) + double(b));
  }
  static void cell4(T* n, const T* pl, const T* pp, const T* pr, __m128i a, __m128i b) {
    __m128 l = _mm_loadu_ps(pl), m = _mm_loadu_ps(pp), r = _mm_loadu_ps(pr);
    __m128d lo = tiltCellPd(_mm_cvtps_pd(l), _mm_cvtps_pd(m), _mm_cvtps_pd(r), _mm_cvtepi32_pd(a),
                            _mm_cvtepi32_pd(b));
    __m128d hi = tiltCellPd(_mm_cvtps_pd(_mm_movehl_ps(l, l)), _mm_cvtps_pd(_mm_movehl_ps(m, m)),
                            _mm_cvtps_pd(_mm_movehl_ps(r, r)), _mm_cvtepi32_pd(highHalf(a)),
                            _mm_cvtepi32_pd(highHalf(b)));
    _mm_storeu_ps(n, _mm_movelh_ps(_mm_cvtpd_ps(lo), _mm_cvtpd_ps(hi)));
  }
};

struct Tilt64f {
  using T = double;
  static T cell(T pl, T pp, T pr, uint32_t a, uint32_t b) {
    return pl - pp + pr + double(a) + double(b);
  }
  static void cell4(T* n, const T* pl, const T* pp, const T* pr, __m128i a, __m128i b) {
    _mm_storeu_pd(n, tiltCellPd(_mm_loadu_pd(pl), _mm_loadu_pd(pp), _mm_loadu_pd(pr),
                                _mm_cvtepi32_pd(a), _mm_cvtepi32_pd(b)));
    _mm_storeu_pd(n + 2, tiltCellPd(_mm_loadu_pd(pl + 2), _mm_loadu_pd(pp + 2), _mm_loadu_pd(pr + 2),
                                    _mm_cvtepi32_pd(highHalf(a)), _mm_cvtepi32_pd(highHalf(b))));
  }
};

// n[x] for x in [from, to) with pixel terms src[x-1], src[x] (squared when
// Square). Reads src[from - 1 .. to - 1].
template <class Plane, bool Square>
inline void tiltedSpan(const uint8_t* src, const typename Plane::T* p, const typename Plane::T* pp,
                       typename Plane::T* n, int from, int to, bool useSimd) {
  int x = from;
  if (useSimd) {
    for (; x + 4 <= to; x += 4) {
      __m128i a = widen4(src + x - 1), b = widen4(src + x);
      if (Square) {
        a = _mm_madd_epi16(a, a);
        b = _mm_madd_epi16(b, b);
      }
      Plane::cell4(n + x, p + x - 1, pp + x, p + x + 1, a, b);
    }
  }
  for (; x < to; ++x) {
    uint32_t a = src[x - 1], b = src[x];
    if (Square) {
      a *= a;
      b *= b;
    }
    n[x] = Plane::cell(p[x - 1], pp[x], p[x + 1], a, b);
  }
}

// How a tilted row treats its last column x = w.
enum class TiltEdge {
  ReadRight,     // the pixel right of the ROI, src[w], is read and counted
  Clear,         // counted as 0 and not read
  AddPrevious,   // 0, and the value already in n[w] is added (deliberate)
};

// Builds tilted row n (w + 2 elements) from rows p and pp and source row src.
template <class Plane, bool Square>
inline void tiltedRow(const uint8_t* src, const typename Plane::T* p, const typename Plane::T* pp,
                      typename Plane::T* n, int w, TiltEdge edge, bool useSimd) {
  n[0] = p[1];
  if (edge == TiltEdge::ReadRight) {
    tiltedSpan<Plane, Square>(src, p, pp, n, 1, w + 1, useSimd);
  } else {
    tiltedSpan<Plane, Square>(src, p, pp, n, 1, w, useSimd);
    uint32_t a = src[w - 1];
    if (Square) a *= a;
    if constexpr (std::is_same<Plane, Tilt32f>::value) {
      if (edge == TiltEdge::AddPrevious) {
        float fresh = float(double(a) + double(p[w - 1]) + double(p[w + 1]) - double(pp[w]));
        n[w] = fresh + n[w];
      } else {
        n[w] = Plane::cell(p[w - 1], pp[w], p[w + 1], a, 0);
      }
    } else {
      n[w] = Plane::cell(p[w - 1], pp[w], p[w + 1], a, 0);
    }
  }
  n[w + 1] = p[w];
}

}  // namespace integral
}  // namespace zelcv

#endif  // ZELCV_KERNELS_INTEGRAL_H
