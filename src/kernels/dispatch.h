// The one place where an operation picks the instruction set of its kernels
// at run time. The load routine decides once what the processor and the
// operating system support (core/load.h); each family says how wide its
// kernels go.
#ifndef ZELCV_KERNELS_DISPATCH_H
#define ZELCV_KERNELS_DISPATCH_H

#include "core/load.h"
#include "kernels/simd.h"

namespace zelcv {

// The instruction sets in order of width.
enum class IsaLevel { Sse2, Avx2, Avx512 };

// An instruction set as a value, so that a generic lambda can receive it.
template <typename I> struct IsaTag {
  using Isa = I;
};

// Calls run(IsaTag<Isa>{}) for the widest instruction set that the load
// routine chose, up to kWidest (the widest one the family has kernels for).
// Every choice gives the same results bit for bit.
template <IsaLevel kWidest, typename Run>
decltype(auto) withChosenIsa(Run&& run) {
  if constexpr (kWidest == IsaLevel::Avx512) {
    if (useAvx512Kernels()) return run(IsaTag<avx512::Isa>{});
  }
  if constexpr (kWidest != IsaLevel::Sse2) {
    if (useAvx2Kernels()) return run(IsaTag<avx2::Isa>{});
  }
  return run(IsaTag<simd::Sse2>{});
}

}  // namespace zelcv

#endif  // ZELCV_KERNELS_DISPATCH_H
