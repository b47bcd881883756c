// The AVX2 instances of the flat morphology cores.
#include "kernels/simd_avx2.h"
#include "morph/morph_cores.h"

namespace zelcv {
namespace morph {

template struct Cores<uint8_t, avx2::Isa>;
template struct Cores<uint16_t, avx2::Isa>;
template struct Cores<int16_t, avx2::Isa>;
template struct Cores<float, avx2::Isa>;

}  // namespace morph
}  // namespace zelcv
