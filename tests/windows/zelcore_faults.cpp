// A test build of zelcore.dll. On Windows zelcv.dll imports zelcore's
// services from whichever zelcore.dll the loader finds first, which is the
// one beside the test executable: this one. It wraps the real services
// (zelcore.cpp compiled into it under other names) and lets the tests make
// them fail through zeltestFaultState().
#include <cstdlib>

#include "zelcore.h"

#define ZELTEST_FAULTS_API  // exported through zelcore_faults.def
#include "fault_state.h"

extern "C" {
void* realZelMalloc(int bytes);
void realZelFree(void* ptr);
int realZelGetMaxCacheSizeB(int* bytes);
uint32_t realZelGetEnabledCpuFeatures(void);
}

namespace {
ZeltestFaultState gState;
}

extern "C" {

ZeltestFaultState* zeltestFaultState(void) { return &gState; }

void* zelMalloc(int bytes) {
  if (!gState.active) return realZelMalloc(bytes);
  int index = gState.allocations++;
  if (gState.failFrom >= 0 && index >= gState.failFrom) return nullptr;
  void* p = realZelMalloc(bytes);
  if (p) ++gState.live;
  gState.lastAllocation = p;
  return p;
}

void zelFree(void* ptr) {
  if (gState.active && ptr) {
    ++gState.releases;
    --gState.live;
    gState.lastRelease = ptr;
  }
  realZelFree(ptr);
}

int zelGetMaxCacheSizeB(int* bytes) {
  if (!gState.active || !gState.cacheOverride) return realZelGetMaxCacheSizeB(bytes);
  ++gState.cacheQueries;
  if (gState.cacheStatus == 0 && bytes) *bytes = gState.cacheBytes;
  return gState.cacheStatus;
}

uint32_t zelGetEnabledCpuFeatures(void) {
  ++gState.featureQueriesSinceStart;
  if (gState.active) ++gState.featureQueries;
  if (gState.active && gState.featureOverride) return gState.features;
  uint32_t mask = realZelGetEnabledCpuFeatures();
  if (const char* keep = std::getenv("ZELTEST_CPU_FEATURES")) mask &= uint32_t(std::strtoul(keep, nullptr, 0));
  return mask;
}

}  // extern "C"
