// zelcv-bench: zelcv against OpenCV on identical inputs, single-threaded.
//   zelcv-bench [--benchmark_filter=REGEX] [other Google Benchmark flags]
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <map>
#include <string>
#include <vector>

#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>

#include "harness.h"

namespace zelbench {

namespace {
std::vector<void (*)()>& families() {
  static std::vector<void (*)()> list;
  return list;
}
}  // namespace

Registrar::Registrar(void (*registerFamily)()) { families().push_back(registerFamily); }

cv::Mat naturalImage(int width, int height, uint32_t seed) {
  cv::Mat image(height, width, CV_8UC1, cv::Scalar(90));
  cv::RNG rng(seed);
  for (int i = 0; i < 40; ++i) {
    cv::Point centre(rng.uniform(0, width), rng.uniform(0, height));
    int radius = rng.uniform(width / 40 + 1, width / 6 + 2);
    cv::circle(image, centre, radius, cv::Scalar(rng.uniform(0, 256)), cv::FILLED, cv::LINE_AA);
  }
  cv::GaussianBlur(image, image, cv::Size(5, 5), 1.5);
  cv::Mat noise(height, width, CV_8UC1);
  rng.fill(noise, cv::RNG::NORMAL, 0, 6);
  cv::add(image, noise, image, cv::noArray(), CV_8U);
  return image;
}

namespace {

// The copy bandwidth: the physical limit of a streaming operation.
void registerBaseline() {
  for (const Size& s : kSizes) {
    benchmark::RegisterBenchmark((std::string("baseline/copy/") + s.name).c_str(),
                                 [s](benchmark::State& state) {
                                   std::vector<uint8_t> a(size_t(s.width) * s.height * 4, 1), b(a.size());
                                   for (auto _ : state) {
                                     std::memcpy(b.data(), a.data(), a.size());
                                     benchmark::ClobberMemory();
                                   }
                                   // Bytes read plus bytes written.
                                   state.SetBytesProcessed(int64_t(state.iterations()) * 2 * a.size());
                                 })
        ->Unit(benchmark::kMicrosecond);
  }
}

struct Result {
  double microseconds = 0;
  double bytesPerSecond = 0;
};

// Collects results while printing the usual console lines. With
// --benchmark_repetitions the table uses the median of the repetitions, which
// is steadier than any single one on a busy machine.
class PairingReporter : public benchmark::ConsoleReporter {
 public:
  explicit PairingReporter(bool cpuTime) : cpuTime(cpuTime) {}
  void ReportRuns(const std::vector<Run>& runs) override {
    ConsoleReporter::ReportRuns(runs);
    for (const Run& run : runs) {
      if (run.error_occurred) continue;
      Result r;
      r.microseconds = cpuTime ? run.GetAdjustedCPUTime() : run.GetAdjustedRealTime();
      auto bytes = run.counters.find("bytes_per_second");
      if (bytes != run.counters.end()) r.bytesPerSecond = bytes->second;
      if (run.run_type == Run::RT_Iteration)
        repetitions[run.run_name.str()].push_back(r);
      else if (run.aggregate_name == "median")
        medians[run.run_name.str()] = r;
    }
  }

  // One result per benchmark: the reported median, or the median repetition.
  std::map<std::string, Result> results() const {
    std::map<std::string, Result> out = medians;
    for (auto [name, runs] : repetitions) {
      if (out.count(name)) continue;
      std::sort(runs.begin(), runs.end(),
                [](const Result& a, const Result& b) { return a.microseconds < b.microseconds; });
      out[name] = runs[runs.size() / 2];
    }
    return out;
  }

 private:
  bool cpuTime;
  std::map<std::string, std::vector<Result>> repetitions;
  std::map<std::string, Result> medians;
};

void printTable(const std::map<std::string, Result>& results) {
  std::map<std::string, double> copyBandwidth;  // by size name
  for (const auto& [name, r] : results)
    if (name.rfind("baseline/copy/", 0) == 0) copyBandwidth[name.substr(14)] = r.bytesPerSecond;

  std::printf("\n%-52s %12s %12s %7s %9s %6s\n", "case", "zelcv us", "opencv us", "ratio",
              "zelcv GB/s", "%copy");
  int slower = 0, pairs = 0;
  double logSum = 0;
  for (const auto& [name, r] : results) {
    const std::string suffix = "/zelcv";
    if (name.size() <= suffix.size() || name.compare(name.size() - suffix.size(), suffix.size(), suffix) != 0)
      continue;
    std::string base = name.substr(0, name.size() - suffix.size());
    auto other = results.find(base + "/opencv");
    if (other == results.end()) continue;
    double ratio = r.microseconds / other->second.microseconds;
    if (ratio > 1.0) ++slower;
    ++pairs;
    logSum += std::log(ratio);
    std::printf("%-52s %12.1f %12.1f %7.2f", base.c_str(), r.microseconds, other->second.microseconds, ratio);
    if (r.bytesPerSecond > 0) {
      std::printf(" %9.2f", r.bytesPerSecond / 1e9);
      for (const auto& [size, bw] : copyBandwidth)
        if (base.find(size) != std::string::npos && bw > 0) std::printf(" %5.0f%%", 100.0 * r.bytesPerSecond / bw);
    }
    std::printf("\n");
  }
  std::printf("\nratio = zelcv time / OpenCV time (below 1.0: zelcv faster); %d case(s) slower\n", slower);
  // The geometric mean weighs a halving and a doubling alike, whatever a row's absolute time.
  if (pairs > 0) std::printf("geometric mean of %d ratios: %.3f\n", pairs, std::exp(logSum / pairs));
}

}  // namespace
}  // namespace zelbench

int main(int argc, char** argv) {
  cv::setNumThreads(1);
  cv::setUseOptimized(true);
  zelbench::registerBaseline();
  for (auto registerFamily : zelbench::families()) registerFamily();
  // --ratio_cpu_time: the table compares the threads' processor time instead
  // of elapsed time. Both sides run on one thread, so on a machine busy with
  // other work this ratio is far steadier than the elapsed one.
  bool cpuTime = false;
  for (int i = 1; i < argc; ++i)
    if (std::strcmp(argv[i], "--ratio_cpu_time") == 0) {
      cpuTime = true;
      for (int j = i; j + 1 < argc; ++j) argv[j] = argv[j + 1];
      --argc;
      break;
    }
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  zelbench::PairingReporter reporter(cpuTime);
  benchmark::RunSpecifiedBenchmarks(&reporter);
  zelbench::printTable(reporter.results());
  if (cpuTime) std::printf("times are the processor time of the calling thread\n");
  benchmark::Shutdown();
  return 0;
}
