#include "core/load.h"

#include "zelcore.h"

namespace zelcv {

namespace {
int gCpuFeatureFlag = 0;
bool gAvx2Kernels = false;
bool gAvx512Kernels = false;
constexpr uint32_t kFlagFeatures = zelCpuSSSE3 | zelCpuSSE41;
// zelcore reports AVX, FMA and AVX2 only where the OS saves the wide
// registers. Every processor with AVX2 so far also has FMA.
constexpr uint32_t kAvx2Features = zelCpuAVX | zelCpuAVX2 | zelCpuFMA;
constexpr uint32_t kAvx512Features = kAvx2Features | zelCpuAVX512F | zelCpuAVX512BW;
}  // namespace

int onLibraryLoad(void* /*module*/, uint32_t reason, void* /*reserved*/) {
  if (reason == kProcessAttach) {
    const uint32_t features = zelGetEnabledCpuFeatures();
    gCpuFeatureFlag = (features & kFlagFeatures) == kFlagFeatures ? 1 : 0;
    gAvx2Kernels = (features & kAvx2Features) == kAvx2Features;
    gAvx512Kernels = (features & kAvx512Features) == kAvx512Features;
  }
  return 1;
}

int cpuFeatureFlag() { return gCpuFeatureFlag; }

bool useAvx2Kernels() { return gAvx2Kernels; }

bool useAvx512Kernels() { return gAvx512Kernels; }

}  // namespace zelcv

// Wire the routine to the platform's loader hook.
#if defined(_WIN32)
#include <windows.h>
extern "C" BOOL WINAPI DllMain(HINSTANCE module, DWORD reason, LPVOID reserved) {
  return zelcv::onLibraryLoad(module, reason, reserved);
}
#else
namespace {
__attribute__((constructor)) void zelcvAttach() { zelcv::onLibraryLoad(nullptr, zelcv::kProcessAttach, nullptr); }
__attribute__((destructor)) void zelcvDetach() { zelcv::onLibraryLoad(nullptr, zelcv::kProcessDetach, nullptr); }
}  // namespace
#endif
