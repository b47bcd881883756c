// The AVX2 instances of the sums-only integral rows.
#include "kernels/integral_avx2.h"

namespace zelcv {
namespace integral {

template ZELCV_INTEGRAL_SUM_ROW(Plane32s, avx2::Isa);
template ZELCV_INTEGRAL_SUM_ROW(Plane32f, avx2::Isa);

}  // namespace integral
}  // namespace zelcv
