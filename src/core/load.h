// The load-time entry and the informational processor-feature flag it sets.
#ifndef ZELCV_CORE_LOAD_H
#define ZELCV_CORE_LOAD_H

#include <stdint.h>

namespace zelcv {

enum LoadReason : uint32_t {
  kProcessDetach = 0,
  kProcessAttach = 1,
  kThreadAttach = 2,
  kThreadDetach = 3,
};

// Acts on process attach only; returns true for every reason.
int onLibraryLoad(void* module, uint32_t reason, void* reserved);

// 1 when the processor reported both feature bits 0x10 and 0x20 at load.
// Informational: no operation consults it.
int cpuFeatureFlag();

// The two choices below are read through withChosenIsa (kernels/dispatch.h).
//
// Whether the AVX2 kernels run instead of the SSE2 ones: chosen at load, when
// the processor and the operating system support AVX2 and FMA. Both give the same
// results bit for bit; before the load routine runs, the SSE2 kernels do.
bool useAvx2Kernels();

// Whether the few kernels that have AVX-512 forms run those: chosen at load,
// when AVX2 kernels run and the processor and the operating system support
// AVX-512 F and BW. The same results again.
bool useAvx512Kernels();

}  // namespace zelcv

#endif  // ZELCV_CORE_LOAD_H
