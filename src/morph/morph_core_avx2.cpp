// The AVX2 instances of the flat morphology cores and of the differences of
// compound morphology.
#include "kernels/morphadv.h"
#include "kernels/simd_avx2.h"
#include "morph/morph_cores.h"

namespace zelcv {
namespace morph {

template struct Cores<uint8_t, avx2::Isa>;
template struct Cores<uint16_t, avx2::Isa>;
template struct Cores<int16_t, avx2::Isa>;
template struct Cores<float, avx2::Isa>;

}  // namespace morph

namespace morphadv {

template void differenceRow<uint8_t, avx2::Isa>(const uint8_t*, const uint8_t*, uint8_t*, int);
template void differenceRow<uint16_t, avx2::Isa>(const uint16_t*, const uint16_t*, uint16_t*, int);
template void differenceRow<int16_t, avx2::Isa>(const int16_t*, const int16_t*, int16_t*, int);
template void differenceRow<float, avx2::Isa>(const float*, const float*, float*, int);

}  // namespace morphadv
}  // namespace zelcv
