// The state that the test build of zelcore.dll shares with the test
// executable on Windows: the executable steers the DLL's services through it.
#ifndef ZELCV_TESTS_WINDOWS_FAULT_STATE_H
#define ZELCV_TESTS_WINDOWS_FAULT_STATE_H

#include <stdint.h>

struct ZeltestFaultState {
  bool active;
  int failFrom;
  bool cacheOverride;
  int cacheStatus;
  int cacheBytes;
  bool featureOverride;
  uint32_t features;
  int featureQueries;
  int allocations;
  int releases;
  int live;
  int cacheQueries;
  void* lastAllocation;
  void* lastRelease;
  int featureQueriesSinceStart;  // never reset: counts the load routine's query
};

#ifndef ZELTEST_FAULTS_API
#define ZELTEST_FAULTS_API __declspec(dllimport)
#endif
extern "C" ZELTEST_FAULTS_API ZeltestFaultState* zeltestFaultState(void);

#endif  // ZELCV_TESTS_WINDOWS_FAULT_STATE_H
