// The AVX-512 instances of the absolute-difference kernels.
#include "kernels/simd_avx512.h"  // first: see there
#include "kernels/absdiff.h"

namespace zelcv {
namespace absdiff {

template ZELCV_ABSDIFF_RUN(uint8_t, avx512::Isa);
template ZELCV_ABSDIFF_RUN(uint16_t, avx512::Isa);
template ZELCV_ABSDIFF_RUN(float, avx512::Isa);

}  // namespace absdiff
}  // namespace zelcv
