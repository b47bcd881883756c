// The AVX-512 instances of the absolute-difference kernels.
#include "kernels/simd_avx512.h"  // first: see there
#include "kernels/absdiff.h"

namespace zelcv {
namespace absdiff {

ZELCV_ABSDIFF_INSTANCES(template, avx512::Isa)

}  // namespace absdiff
}  // namespace zelcv
