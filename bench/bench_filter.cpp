// Separable filtering of a whole image: zelcv's row pass then column pass,
// rows streamed through a ring of K intermediate rows as a caller would,
// against cv::sepFilter2D with the same kernels and replicated borders.
#include <algorithm>
#include <string>
#include <vector>

#include <opencv2/imgproc.hpp>

#include "harness.h"

namespace {

// Integer smoothing kernels whose row sums fit 16 bits for 8-bit input.
std::vector<Zel16s> integerKernel(int size) {
  if (size == 3) return {1, 2, 1};
  if (size == 5) return {1, 4, 6, 4, 1};
  return {1, 3, 7, 12, 18, 12, 7, 3, 1};
}

// The binomial row of `size` taps (1 4 6 4 1 for 5): sum 2^(size-1).
std::vector<Zel16s> binomialKernel(int size) {
  std::vector<Zel16s> k(1, 1);
  for (int i = 1; i < size; ++i) {
    std::vector<Zel16s> next(k.size() + 1, 0);
    for (size_t j = 0; j < k.size(); ++j) {
      next[j] = Zel16s(next[j] + k[j]);
      next[j + 1] = Zel16s(next[j + 1] + k[j]);
    }
    k = next;
  }
  return k;
}

std::vector<Zel32f> floatKernel(int size) {
  std::vector<Zel16s> k = integerKernel(size);
  float sum = 0;
  for (Zel16s t : k) sum += t;
  std::vector<Zel32f> f;
  for (Zel16s t : k) f.push_back(t / sum);
  return f;
}

// Streams the image through the two passes. `rowPass(y, out)` filters source
// row y into `out`; `columnPass(rows, y)` writes output row y from K row
// pointers. Vertical borders replicate the first and last rows.
template <typename T, class RowPass, class ColumnPass>
void streamImage(int width, int height, int size, std::vector<std::vector<T>>& ring, RowPass rowPass,
                 ColumnPass columnPass) {
  const int anchor = size / 2;
  std::vector<const T*> rows(size);
  int filtered = 0;  // source rows already in the ring
  for (int y = 0; y < height; ++y) {
    const int last = std::min(y - anchor + size - 1, height - 1);
    for (; filtered <= last; ++filtered) rowPass(filtered, ring[filtered % size].data());
    for (int k = 0; k < size; ++k) {
      const int source = std::min(std::max(y - anchor + k, 0), height - 1);
      rows[k] = ring[source % size].data();
    }
    columnPass(rows.data(), y);
  }
  (void)width;
}

// zelcv's 8u->16s pipeline over a whole image, one row pass and one column
// pass per row through a ring, with the same kernel in both directions.
void run8u16sPipeline(benchmark::State& state, const zelbench::Size& s, const std::vector<Zel16s>& kernel,
                      int rowDivisor, int columnDivisor) {
  const int size = int(kernel.size()), anchor = size / 2;
  cv::Mat src = zelbench::naturalImage(s.width, s.height);
  cv::Mat dst(s.height, s.width, CV_16S);
  int rowBytes = 0, columnBytes = 0;
  zeliFilterRowBorderPipelineGetBufferSize_8u16s_C1R({s.width, 1}, size, &rowBytes);
  zeliFilterColumnPipelineGetBufferSize_16s_C1R({s.width, 1}, size, &columnBytes);
  std::vector<Zel8u> rowBuffer(rowBytes), columnBuffer(columnBytes);
  std::vector<std::vector<Zel16s>> ring(size, std::vector<Zel16s>(s.width));
  for (auto _ : state) {
    streamImage<Zel16s>(
        s.width, s.height, size, ring,
        [&](int y, Zel16s* out) {
          zeliFilterRowBorderPipeline_8u16s_C1R(src.ptr<Zel8u>(y), zelbench::stepOf(src), &out, {s.width, 1},
                                                kernel.data(), size, anchor, zelBorderReplicate, 0, rowDivisor,
                                                rowBuffer.data());
        },
        [&](const Zel16s** rows, int y) {
          zeliFilterColumnPipeline_16s_C1R(rows, dst.ptr<Zel16s>(y), zelbench::stepOf(dst), {s.width, 1},
                                           kernel.data(), size, columnDivisor, columnBuffer.data());
        });
    benchmark::ClobberMemory();
  }
  state.SetBytesProcessed(int64_t(state.iterations()) * s.width * s.height * 3);
}

// OpenCV's separable filter of the same image into 16s with float kernels.
void runCvSepFilter16s(benchmark::State& state, const zelbench::Size& s, const cv::Mat& kx, const cv::Mat& ky) {
  cv::Mat src = zelbench::naturalImage(s.width, s.height);
  cv::Mat dst;
  for (auto _ : state) {
    cv::sepFilter2D(src, dst, CV_16S, kx, ky, cv::Point(-1, -1), 0, cv::BORDER_REPLICATE);
    benchmark::ClobberMemory();
  }
  state.SetBytesProcessed(int64_t(state.iterations()) * s.width * s.height * 3);
}

void registerSepFilter() {
  const zelbench::Size s = zelbench::kSizes[1];  // 1920x1080
  for (int size : {3, 5, 9}) {
    const std::string k = "k" + std::to_string(size) + "/" + s.name;
    const int anchor = size / 2;

    zelbench::registerPair(
        "sepfilter", "8u16s/" + k,
        [=](benchmark::State& state) {
          const int divisor = (size == 3 ? 4 : size == 5 ? 16 : 64);
          run8u16sPipeline(state, s, integerKernel(size), 1, divisor * divisor);
        },
        [=](benchmark::State& state) {
          const std::vector<Zel32f> f = floatKernel(size);
          cv::Mat kx(1, size, CV_32F), ky(1, size, CV_32F);
          const std::vector<Zel16s> kernel = integerKernel(size);
          for (int i = 0; i < size; ++i) {
            kx.at<float>(i) = kernel[i];
            ky.at<float>(i) = f[i] / float(size == 3 ? 4 : size == 5 ? 16 : 64);
          }
          runCvSepFilter16s(state, s, kx, ky);
        });

    // A row divisor other than 1: the binomial row of the size normalised by
    // 16 (its 8-bit products need more than 16 bits at size 9), then the
    // binomial column normalised by its sum. OpenCV gets the same kernels as
    // floats, divisors applied.
    zelbench::registerPair(
        "sepfilter", "8u16s_rowdiv16/" + k,
        [=](benchmark::State& state) { run8u16sPipeline(state, s, binomialKernel(size), 16, 1 << (size - 1)); },
        [=](benchmark::State& state) {
          const std::vector<Zel16s> kernel = binomialKernel(size);
          cv::Mat kx(1, size, CV_32F), ky(1, size, CV_32F);
          for (int i = 0; i < size; ++i) {
            kx.at<float>(i) = kernel[i] / 16.0f;
            ky.at<float>(i) = kernel[i] / float(1 << (size - 1));
          }
          runCvSepFilter16s(state, s, kx, ky);
        });

    zelbench::registerPair(
        "sepfilter", "32f/" + k,
        [=](benchmark::State& state) {
          cv::Mat src = zelbench::randomMat(s.width, s.height, CV_32F);
          cv::Mat dst(s.height, s.width, CV_32F);
          const std::vector<Zel32f> kernel = floatKernel(size);
          int rowBytes = 0, columnBytes = 0;
          zeliFilterRowBorderPipelineGetBufferSize_32f_C1R({s.width, 1}, size, &rowBytes);
          zeliFilterColumnPipelineGetBufferSize_32f_C1R({s.width, 1}, size, &columnBytes);
          std::vector<Zel8u> rowBuffer(rowBytes), columnBuffer(columnBytes);
          std::vector<std::vector<Zel32f>> ring(size, std::vector<Zel32f>(s.width));
          for (auto _ : state) {
            streamImage<Zel32f>(
                s.width, s.height, size, ring,
                [&](int y, Zel32f* out) {
                  zeliFilterRowBorderPipeline_32f_C1R(src.ptr<Zel32f>(y), zelbench::stepOf(src), &out,
                                                      {s.width, 1}, kernel.data(), size, anchor,
                                                      zelBorderReplicate, 0.0f, rowBuffer.data());
                },
                [&](const Zel32f** rows, int y) {
                  zeliFilterColumnPipeline_32f_C1R(rows, dst.ptr<Zel32f>(y), zelbench::stepOf(dst), {s.width, 1},
                                                   kernel.data(), size, columnBuffer.data());
                });
            benchmark::ClobberMemory();
          }
          state.SetBytesProcessed(int64_t(state.iterations()) * s.width * s.height * 8);
        },
        [=](benchmark::State& state) {
          cv::Mat src = zelbench::randomMat(s.width, s.height, CV_32F);
          cv::Mat dst;
          const std::vector<Zel32f> f = floatKernel(size);
          cv::Mat kx(1, size, CV_32F, const_cast<Zel32f*>(f.data()));
          for (auto _ : state) {
            cv::sepFilter2D(src, dst, CV_32F, kx, kx, cv::Point(-1, -1), 0, cv::BORDER_REPLICATE);
            benchmark::ClobberMemory();
          }
          state.SetBytesProcessed(int64_t(state.iterations()) * s.width * s.height * 8);
        });
  }
}

zelbench::Registrar registrar(&registerSepFilter);

}  // namespace
