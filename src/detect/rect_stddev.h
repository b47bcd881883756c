// Row kernels of the rectangle standard deviation: four corner rows of an
// integral and of a squared integral in, one row of deviations out. Upright
// and tilted rectangles differ only in where the corners are, so both use
// these. Scalar reference and SSE2 path give identical bits.
#ifndef ZELCV_DETECT_RECT_STDDEV_H
#define ZELCV_DETECT_RECT_STDDEV_H

#include <emmintrin.h>
#include <stdint.h>

#include <cmath>

namespace zelcv {
namespace rectstd {

// The four corner rows of one plane, already offset to the first output
// pixel: S = (tl - tr) + (br - bl).
template <typename T>
struct Corners {
  const T* tl;
  const T* tr;
  const T* bl;
  const T* br;
};

// Integral planes. sum() gives the rectangle's sum as a double; sum4() the
// sums of four neighbouring rectangles as two double pairs.
struct Sum32f {  // single-precision corners, single-precision difference
  using T = float;
  static double sum(const Corners<T>& c, int x) {
    return double((c.tl[x] - c.tr[x]) + (c.br[x] - c.bl[x]));
  }
  static void sum4(const Corners<T>& c, int x, __m128d& lo, __m128d& hi) {
    __m128 s = _mm_add_ps(_mm_sub_ps(_mm_loadu_ps(c.tl + x), _mm_loadu_ps(c.tr + x)),
                          _mm_sub_ps(_mm_loadu_ps(c.br + x), _mm_loadu_ps(c.bl + x)));
    lo = _mm_cvtps_pd(s);
    hi = _mm_cvtps_pd(_mm_movehl_ps(s, s));
  }
};

inline __m128i wrappedDifference4(const uint32_t* tl, const uint32_t* tr, const uint32_t* bl,
                                  const uint32_t* br, int x) {
  auto ld = [x](const uint32_t* p) { return _mm_loadu_si128(reinterpret_cast<const __m128i*>(p + x)); };
  return _mm_add_epi32(_mm_sub_epi32(ld(tl), ld(tr)), _mm_sub_epi32(ld(br), ld(bl)));
}

// 32-bit integrals: the difference is taken modulo 2^32, which is exact even
// when the integral itself wrapped; read as signed.
struct Sum32s {
  using T = uint32_t;
  static double sum(const Corners<T>& c, int x) {
    return double(int32_t((c.tl[x] - c.tr[x]) + (c.br[x] - c.bl[x])));
  }
  static void sum4(const Corners<T>& c, int x, __m128d& lo, __m128d& hi) {
    __m128i s = wrappedDifference4(c.tl, c.tr, c.bl, c.br, x);
    lo = _mm_cvtepi32_pd(s);
    hi = _mm_cvtepi32_pd(_mm_shuffle_epi32(s, 0xEE));
  }
};

// 32-bit squared integrals: a sum of squares is never negative, so the
// wrapped difference is read as unsigned.
struct SumSq32u {
  using T = uint32_t;
  static double sum(const Corners<T>& c, int x) {
    return double(uint32_t((c.tl[x] - c.tr[x]) + (c.br[x] - c.bl[x])));
  }
  static void sum4(const Corners<T>& c, int x, __m128d& lo, __m128d& hi) {
    const __m128i bias = _mm_set1_epi32(int32_t(0x80000000u));
    const __m128d back = _mm_set1_pd(2147483648.0);
    __m128i s = _mm_xor_si128(wrappedDifference4(c.tl, c.tr, c.bl, c.br, x), bias);
    lo = _mm_add_pd(_mm_cvtepi32_pd(s), back);
    hi = _mm_add_pd(_mm_cvtepi32_pd(_mm_shuffle_epi32(s, 0xEE)), back);
  }
};

struct SumSq64f {
  using T = double;
  static double sum(const Corners<T>& c, int x) {
    return (c.tl[x] - c.tr[x]) + (c.br[x] - c.bl[x]);
  }
  static __m128d sum2(const Corners<T>& c, int x) {
    return _mm_add_pd(_mm_sub_pd(_mm_loadu_pd(c.tl + x), _mm_loadu_pd(c.tr + x)),
                      _mm_sub_pd(_mm_loadu_pd(c.br + x), _mm_loadu_pd(c.bl + x)));
  }
  static void sum4(const Corners<T>& c, int x, __m128d& lo, __m128d& hi) {
    lo = sum2(c, x);
    hi = sum2(c, x + 2);
  }
};

// Results. The variance arrives in double precision.
struct Out32f {  // rounded to single precision, negative to 0, single root
  using T = float;
  static float finish(double variance, double) {
    float v = float(variance);
    if (v < 0.0f) v = 0.0f;
    return std::sqrt(v);
  }
  static void finish4(T* out, __m128d lo, __m128d hi, __m128d) {
    __m128 v = _mm_movelh_ps(_mm_cvtpd_ps(lo), _mm_cvtpd_ps(hi));
    v = _mm_andnot_ps(_mm_cmplt_ps(v, _mm_setzero_ps()), v);
    _mm_storeu_ps(out, _mm_sqrt_ps(v));
  }
};

// Scaled integer: double root times 2^-scaleFactor, saturated above, rounded
// to nearest by the conversion instruction itself in both paths.
struct Out32sScaled {
  using T = int32_t;
  static constexpr double kMax = 2147483647.0;
  static int32_t finish(double variance, double scale) {
    if (variance < 0.0) variance = 0.0;
    double d = std::sqrt(variance) * scale;
    if (!(d < kMax)) d = kMax;
    return _mm_cvtsd_si32(_mm_set_sd(d));
  }
  static __m128i finish2(__m128d v, __m128d scale) {
    v = _mm_andnot_pd(_mm_cmplt_pd(v, _mm_setzero_pd()), v);
    __m128d d = _mm_mul_pd(_mm_sqrt_pd(v), scale);
    __m128d big = _mm_cmpnlt_pd(d, _mm_set1_pd(kMax));
    d = _mm_or_pd(_mm_andnot_pd(big, d), _mm_and_pd(big, _mm_set1_pd(kMax)));
    return _mm_cvtpd_epi32(d);
  }
  static void finish4(T* out, __m128d lo, __m128d hi, __m128d scale) {
    __m128i r = _mm_unpacklo_epi64(finish2(lo, scale), finish2(hi, scale));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out), r);
  }
};

// How the variance comes from S, Q and the count n.
enum class Moments {
  MeanSquare,  // mean = S x inv, variance = Q x inv - mean^2
  Numerator,   // variance = (n x Q - S^2) / n^2: exact 0 for a constant area
};

template <Moments M>
inline double variance(double S, double Q, double inv, double n, double nn) {
  if (M == Moments::MeanSquare) {
    double mean = S * inv;
    double sq = Q * inv;
    double mm = mean * mean;
    return sq - mm;
  }
  double nq = n * Q;
  double ss = S * S;
  return (nq - ss) / nn;
}

template <Moments M>
inline __m128d variance2(__m128d S, __m128d Q, __m128d inv, __m128d n, __m128d nn) {
  if (M == Moments::MeanSquare) {
    __m128d mean = _mm_mul_pd(S, inv);
    return _mm_sub_pd(_mm_mul_pd(Q, inv), _mm_mul_pd(mean, mean));
  }
  return _mm_div_pd(_mm_sub_pd(_mm_mul_pd(n, Q), _mm_mul_pd(S, S)), nn);
}

// One output row; all arithmetic in double.
template <class Sum, class Sq, class Out, Moments M>
inline void stdDevRow(const Corners<typename Sum::T>& s, const Corners<typename Sq::T>& q,
                      typename Out::T* out, int w, double inv, double n, double scale,
                      bool useSimd) {
  const double nn = n * n;
  int x = 0;
  if (useSimd) {
    const __m128d vinv = _mm_set1_pd(inv), vn = _mm_set1_pd(n), vnn = _mm_set1_pd(nn);
    const __m128d vscale = _mm_set1_pd(scale);
    for (; x + 4 <= w; x += 4) {
      __m128d slo, shi, qlo, qhi;
      Sum::sum4(s, x, slo, shi);
      Sq::sum4(q, x, qlo, qhi);
      Out::finish4(out + x, variance2<M>(slo, qlo, vinv, vn, vnn),
                   variance2<M>(shi, qhi, vinv, vn, vnn), vscale);
    }
  }
  for (; x < w; ++x)
    out[x] = Out::finish(variance<M>(Sum::sum(s, x), Sq::sum(q, x), inv, n, nn), scale);
}

}  // namespace rectstd
}  // namespace zelcv

#endif  // ZELCV_DETECT_RECT_STDDEV_H
