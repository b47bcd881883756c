// Fault injection for zelcore's services. The test executables define
// zelMalloc, zelFree, zelGetMaxCacheSizeB and zelGetEnabledCpuFeatures
// themselves; the dynamic linker binds the library's imports to these
// definitions, which forward to the real support library unless a test asks
// for a fault.
//
// The processor features also pass through the mask in the environment
// variable ZELTEST_CPU_FEATURES when it is set, from the library's load
// routine on: a whole test run can so hide AVX2 and exercise the baseline
// kernels.
#ifndef ZELCV_TESTS_FAULT_INJECTION_H
#define ZELCV_TESTS_FAULT_INJECTION_H

#include <cstdint>

namespace zeltest {

// Restores normal behaviour when it goes out of scope.
class FaultInjection {
 public:
  FaultInjection();
  ~FaultInjection();
  FaultInjection(const FaultInjection&) = delete;
  FaultInjection& operator=(const FaultInjection&) = delete;

  // The allocation with this 0-based index (counted from construction) and
  // every later one return null; -1 turns failures off.
  void failAllocationsFrom(int index);
  // zelGetMaxCacheSizeB answers with this status and, when it is 0, this size.
  void setCacheAnswer(int status, int bytes);
  // zelGetEnabledCpuFeatures answers with this mask.
  void setCpuFeatures(uint32_t mask);

  int allocations() const;      // zelMalloc calls since construction
  int releases() const;         // zelFree calls with a non-null pointer
  int liveBlocks() const;       // allocated and not yet released
  int cacheQueries() const;     // zelGetMaxCacheSizeB calls
  int cpuFeatureQueries() const;  // zelGetEnabledCpuFeatures calls
  void* lastAllocation() const;
  void* lastRelease() const;
};

// zelGetEnabledCpuFeatures calls since the process started, the library's
// load routine included.
int cpuFeatureQueriesSinceStart();

}  // namespace zeltest

#endif  // ZELCV_TESTS_FAULT_INJECTION_H
