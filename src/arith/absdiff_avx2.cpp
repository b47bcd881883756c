// The AVX2 instances of the absolute-difference kernels.
#include "kernels/absdiff.h"
#include "kernels/simd_avx2.h"

namespace zelcv {
namespace absdiff {

template ZELCV_ABSDIFF_RUN(uint8_t, avx2::Isa);
template ZELCV_ABSDIFF_RUN(uint16_t, avx2::Isa);
template ZELCV_ABSDIFF_RUN(float, avx2::Isa);

}  // namespace absdiff
}  // namespace zelcv
