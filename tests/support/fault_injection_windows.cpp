// Windows: DLL imports cannot be interposed from the executable, so the tests
// run beside a test build of zelcore.dll (tests/windows/zelcore_faults.cpp)
// that zelcv.dll loads instead of the real one; this side steers it.
#if defined(_WIN32)
#include "support/fault_injection.h"

#include "windows/fault_state.h"

namespace zeltest {

namespace {
ZeltestFaultState& state() { return *zeltestFaultState(); }

void reset(bool active) {
  ZeltestFaultState& s = state();
  int sinceStart = s.featureQueriesSinceStart;
  s = ZeltestFaultState();
  s.failFrom = -1;
  s.active = active;
  s.featureQueriesSinceStart = sinceStart;
}
}  // namespace

FaultInjection::FaultInjection() { reset(true); }
FaultInjection::~FaultInjection() { reset(false); }

void FaultInjection::failAllocationsFrom(int index) { state().failFrom = index; }
void FaultInjection::setCacheAnswer(int status, int bytes) {
  state().cacheOverride = true;
  state().cacheStatus = status;
  state().cacheBytes = bytes;
}
void FaultInjection::setCpuFeatures(uint32_t mask) {
  state().featureOverride = true;
  state().features = mask;
}
int FaultInjection::cpuFeatureQueries() const { return state().featureQueries; }
int cpuFeatureQueriesSinceStart() { return state().featureQueriesSinceStart; }
int FaultInjection::allocations() const { return state().allocations; }
int FaultInjection::releases() const { return state().releases; }
int FaultInjection::liveBlocks() const { return state().live; }
int FaultInjection::cacheQueries() const { return state().cacheQueries; }
void* FaultInjection::lastAllocation() const { return state().lastAllocation; }
void* FaultInjection::lastRelease() const { return state().lastRelease; }

}  // namespace zeltest

#endif  // _WIN32
