// The AVX2 instances of the absolute-difference kernels.
#include "kernels/absdiff.h"
#include "kernels/simd_avx2.h"

namespace zelcv {
namespace absdiff {

ZELCV_ABSDIFF_INSTANCES(template, avx2::Isa)

}  // namespace absdiff
}  // namespace zelcv
