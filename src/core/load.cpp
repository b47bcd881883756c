#include "core/load.h"

#include "zelcore.h"

namespace zelcv {

namespace {
int gCpuFeatureFlag = 0;
constexpr uint32_t kFlagFeatures = 0x10u | 0x20u;
}  // namespace

int onLibraryLoad(void* /*module*/, uint32_t reason, void* /*reserved*/) {
  if (reason == kProcessAttach)
    gCpuFeatureFlag = (zelGetEnabledCpuFeatures() & kFlagFeatures) == kFlagFeatures ? 1 : 0;
  return 1;
}

int cpuFeatureFlag() { return gCpuFeatureFlag; }

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
