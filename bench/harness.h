// Shared pieces of the benchmarks. Every comparison registers two benchmarks
// named "<family>/<case>/zelcv" and "<family>/<case>/opencv"; the harness
// pairs them and prints the ratio of zelcv's time to OpenCV's. A benchmark
// that calls state.SetBytesProcessed also gets its bandwidth printed against
// the copy bandwidth measured in the same run ("baseline/copy/<size>").
#ifndef ZELCV_BENCH_HARNESS_H
#define ZELCV_BENCH_HARNESS_H

#include <benchmark/benchmark.h>

#include <cstdint>
#include <random>
#include <vector>

#include <opencv2/core.hpp>

#include "zelcv.h"

namespace zelbench {

struct Size {
  int width, height;
  const char* name;
};
// The sizes every streaming family is measured at.
inline const Size kSizes[] = {{640, 480, "640x480"}, {1920, 1080, "1920x1080"}, {4096, 4096, "4096x4096"}};

// A matrix of random values. OpenCV owns the memory; zelcv gets its data
// pointer and step, so both libraries read the same bytes.
inline cv::Mat randomMat(int width, int height, int type, uint32_t seed = 1) {
  cv::Mat m(height, width, type);
  cv::RNG rng(seed);
  if (m.depth() == CV_32F)
    rng.fill(m, cv::RNG::UNIFORM, 0.0, 255.0);
  else
    rng.fill(m, cv::RNG::UNIFORM, 0, 256);
  return m;
}

// A natural-looking 8-bit picture: smooth shapes plus noise.
cv::Mat naturalImage(int width, int height, uint32_t seed = 7);

inline ZeliSize roiOf(const cv::Mat& m) { return {m.cols, m.rows}; }
inline int stepOf(const cv::Mat& m) { return static_cast<int>(m.step[0]); }

// Registers a pair under "<family>/<case>/zelcv" and ".../opencv".
template <typename Z, typename O>
void registerPair(const std::string& family, const std::string& name, Z zelcvFn, O opencvFn) {
  benchmark::RegisterBenchmark((family + "/" + name + "/zelcv").c_str(), zelcvFn)->Unit(benchmark::kMicrosecond);
  benchmark::RegisterBenchmark((family + "/" + name + "/opencv").c_str(), opencvFn)->Unit(benchmark::kMicrosecond);
}

// Each bench file defines one registration function and adds it here through
// a static Registrar, so that main() sees every family.
struct Registrar {
  explicit Registrar(void (*registerFamily)());
};

}  // namespace zelbench

#endif  // ZELCV_BENCH_HARNESS_H
