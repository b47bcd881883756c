// The processing cores of flat morphology, callable inside the library (the
// exports of this family and compound morphology use them). Arguments are
// already checked: sizes positive, steps large enough, the work memory at
// least the family's buffer size for this width and mask.
#ifndef ZELCV_MORPH_MORPH_CORE_H
#define ZELCV_MORPH_MORPH_CORE_H

#include <stdint.h>

#include "kernels/simd.h"
#include "morph/morph_state.h"
#include "zelcv.h"

namespace zelcv {
namespace morph {

// Maximum (or minimum) over a solid rw x rh rectangle whose top-left element
// lies at (-ox, -oy) from the output pixel, replicated border. The offsets
// may lie outside the rectangle. `work` holds filterBufferSize bytes.
// Element types: uint8_t, uint16_t, int16_t, float.
template <typename T>
void rectFilter(bool max, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int channels,
                int rw, int rh, int ox, int oy, uint8_t* work);

// Called with each output row's index as soon as that row is final (in any
// order), so that a caller can finish the row while it is in the cache.
struct RowSink {
  void (*fn)(const void* context, int y) = nullptr;
  const void* context = nullptr;
  void operator()(int y) const {
    if (fn) fn(context, y);
  }
};

// Dilation (max) or erosion (min) with a state; `border` is 1 or 6 with any
// side flags. `work` holds commonBufferSize bytes. src == dst is allowed.
template <typename T>
void apply(bool dilate, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int channels,
           ZeliBorderType border, const View& state, uint8_t* work, const RowSink& sink = RowSink());

// The cores of one instruction set (simd::Sse2 or avx2::Isa), behind the two
// entries above; both sets give the same results bit for bit.
template <typename T, typename Isa>
struct Cores {
  static void rect(bool max, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int channels, int rw,
                   int rh, int ox, int oy, uint8_t* work);
  static void apply(bool dilate, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int channels,
                    ZeliBorderType border, const View& state, uint8_t* work, const RowSink& sink);
};
// Built in morph_core_avx2.cpp.
extern template struct Cores<uint8_t, avx2::Isa>;
extern template struct Cores<uint16_t, avx2::Isa>;
extern template struct Cores<int16_t, avx2::Isa>;
extern template struct Cores<float, avx2::Isa>;

// The same on 1-bit images (src != dst).
void applyBits(bool dilate, const uint8_t* src, int srcStep, int srcBitOffset, uint8_t* dst, int dstStep,
               int dstBitOffset, ZeliSize roi, ZeliBorderType border, const View& state, uint8_t* work);

}  // namespace morph
}  // namespace zelcv

#endif  // ZELCV_MORPH_MORPH_CORE_H
