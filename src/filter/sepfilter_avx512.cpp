// The AVX-512 instances of the 32f span routines: the 512-bit forms of the
// floating-point operations their policies use, lane for lane the same
// arithmetic as the SSE2 and AVX2 forms.
#include "kernels/simd_avx512.h"  // first: see there
#include "filter/sepfilter_kernels.h"

namespace zelcv {
namespace sep {

template <> struct Wide<avx512::Isa> {
  using F = __m512;
  using D = __m512d;
  static constexpr int kFloats = 16;

  static F setf(float a) { return _mm512_set1_ps(a); }
  static F addf(F a, F b) { return _mm512_add_ps(a, b); }
  static F mulf(F a, F b) { return _mm512_mul_ps(a, b); }
  static float firstf(F a) { return _mm512_cvtss_f32(a); }
  static F loadf(const float* p) { return _mm512_loadu_ps(p); }
  static void storef(float* p, F a) { _mm512_storeu_ps(p, a); }

  static D setd(double a) { return _mm512_set1_pd(a); }
  static D muld(D a, D b) { return _mm512_mul_pd(a, b); }
  // Exact products: the fused form rounds as the separate ones (see AVX2).
  static D addExactProductd(D acc, D a, D b) { return _mm512_fmadd_pd(a, b, acc); }
  static double firstd(D a) { return _mm512_cvtsd_f64(a); }
  // Lanes r .. r + 7 of the concatenation lo:hi.
  template <int r> static D shiftd(D lo, D hi) {
    return _mm512_castsi512_pd(_mm512_alignr_epi64(_mm512_castpd_si512(hi), _mm512_castpd_si512(lo), r));
  }
  static D widen(const float* p) { return _mm512_cvtps_pd(_mm256_loadu_ps(p)); }
  static void storeNarrowed(float* p, D a0, D a1) {
    _mm256_storeu_ps(p, _mm512_cvtpd_ps(a0));
    _mm256_storeu_ps(p + 8, _mm512_cvtpd_ps(a1));
  }

  static F tapf(const __m128* p) { return _mm512_broadcastss_ps(*p); }
  static D tapd(const __m128d* p) { return _mm512_broadcastsd_pd(*p); }
};

#define ZELCV_SEP_INSTANCE(Isa, P, Src, Taps) template ZELCV_SEP_SPAN(Isa, P, Src, Taps)
ZELCV_SEP_WIDEST_SPANS(ZELCV_SEP_INSTANCE, avx512::Isa)

}  // namespace sep
}  // namespace zelcv
