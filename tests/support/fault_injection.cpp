// Linux: the test executable defines zelcore's functions and the dynamic
// linker binds zelcv's imports to them. Windows: fault_injection_windows.cpp.
#if !defined(_WIN32)
#include "support/fault_injection.h"

#include <dlfcn.h>

#include <cstdlib>

#include "zelcore.h"

namespace {

struct Injection {
  bool active = false;
  int failFrom = -1;
  bool cacheOverride = false;
  int cacheStatus = 0;
  int cacheBytes = 0;
  bool featureOverride = false;
  uint32_t features = 0;
  int featureQueries = 0;
  int allocations = 0;
  int releases = 0;
  int live = 0;
  int cacheQueries = 0;
  void* lastAllocation = nullptr;
  void* lastRelease = nullptr;
};
Injection gInjection;
int gFeatureQueriesSinceStart = 0;

template <typename F>
F realFunction(const char* name) {
  void* f = dlsym(RTLD_NEXT, name);
  if (!f) std::abort();  // the support library must be loaded after us
  return reinterpret_cast<F>(f);
}

}  // namespace

extern "C" {

void* zelMalloc(int bytes) {
  static auto real = realFunction<void* (*)(int)>("zelMalloc");
  if (!gInjection.active) return real(bytes);
  int index = gInjection.allocations++;
  if (gInjection.failFrom >= 0 && index >= gInjection.failFrom) return nullptr;
  void* p = real(bytes);
  if (p) ++gInjection.live;
  gInjection.lastAllocation = p;
  return p;
}

void zelFree(void* ptr) {
  static auto real = realFunction<void (*)(void*)>("zelFree");
  if (gInjection.active && ptr) {
    ++gInjection.releases;
    --gInjection.live;
    gInjection.lastRelease = ptr;
  }
  real(ptr);
}

int zelGetMaxCacheSizeB(int* bytes) {
  static auto real = realFunction<int (*)(int*)>("zelGetMaxCacheSizeB");
  if (!gInjection.active || !gInjection.cacheOverride) return real(bytes);
  ++gInjection.cacheQueries;
  if (gInjection.cacheStatus == 0 && bytes) *bytes = gInjection.cacheBytes;
  return gInjection.cacheStatus;
}

uint32_t zelGetEnabledCpuFeatures(void) {
  static auto real = realFunction<uint32_t (*)(void)>("zelGetEnabledCpuFeatures");
  ++gFeatureQueriesSinceStart;
  if (gInjection.active) ++gInjection.featureQueries;
  if (gInjection.active && gInjection.featureOverride) return gInjection.features;
  uint32_t mask = real();
  if (const char* keep = std::getenv("ZELTEST_CPU_FEATURES")) mask &= uint32_t(std::strtoul(keep, nullptr, 0));
  return mask;
}

}  // extern "C"

namespace zeltest {

FaultInjection::FaultInjection() {
  gInjection = Injection();
  gInjection.active = true;
}
FaultInjection::~FaultInjection() { gInjection = Injection(); }

void FaultInjection::failAllocationsFrom(int index) { gInjection.failFrom = index; }
void FaultInjection::setCacheAnswer(int status, int bytes) {
  gInjection.cacheOverride = true;
  gInjection.cacheStatus = status;
  gInjection.cacheBytes = bytes;
}
void FaultInjection::setCpuFeatures(uint32_t mask) {
  gInjection.featureOverride = true;
  gInjection.features = mask;
}
int FaultInjection::cpuFeatureQueries() const { return gInjection.featureQueries; }
int cpuFeatureQueriesSinceStart() { return gFeatureQueriesSinceStart; }
int FaultInjection::allocations() const { return gInjection.allocations; }
int FaultInjection::releases() const { return gInjection.releases; }
int FaultInjection::liveBlocks() const { return gInjection.live; }
int FaultInjection::cacheQueries() const { return gInjection.cacheQueries; }
void* FaultInjection::lastAllocation() const { return gInjection.lastAllocation; }
void* FaultInjection::lastRelease() const { return gInjection.lastRelease; }

}  // namespace zeltest

#endif  // !_WIN32
