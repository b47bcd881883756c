// Accumulation ("accumulate") and absolute differences ("absdiff") against
// OpenCV's accumulate* and absdiff, for 8u, 16u and 32f sources at every size.
// Bytes processed count every byte read and written (an in-place
// accumulator twice), so the bandwidth compares with the copy baseline.
#include <opencv2/imgproc.hpp>

#include <functional>
#include <string>

#include "harness.h"

namespace {

using zelbench::kSizes;
using zelbench::randomMat;
using zelbench::roiOf;
using zelbench::stepOf;

// The images of one case: two sources of the source type, a mask of regions
// (the brighter shapes of a natural picture, as a foreground mask would be)
// and the written image.
struct Images {
  cv::Mat src1, src2, mask, out;
  int frames = 0;
  Images(const zelbench::Size& s, int srcType, int outType)
      : src1(randomMat(s.width, s.height, srcType, 1)),
        src2(randomMat(s.width, s.height, srcType, 2)),
        mask(zelbench::naturalImage(s.width, s.height, 3)),
        out(randomMat(s.width, s.height, outType, 4)) {
    cv::threshold(mask, mask, 120, 255, cv::THRESH_BINARY);
  }
  // The next frame of a running average: the two sources in turn, as a
  // changing scene gives. Averaging one frame over and over would drive the
  // pixels where it is 0 into subnormal numbers after some hundred calls, so
  // that each side's timing would depend on how many calls it happened to
  // make before measuring.
  const cv::Mat& frame() { return (frames++ & 1) ? src2 : src1; }
};

template <typename T>
const T* in(const cv::Mat& m) {
  return m.ptr<T>();
}

using Call = std::function<void(Images&)>;

// Registers one case at every size. `bytesPerPixel` counts reads and writes.
void addCase(const std::string& family, const std::string& name, int srcType, int outType, int bytesPerPixel,
             Call zelcvCall, Call opencvCall) {
  for (const zelbench::Size& s : kSizes) {
    auto run = [s, srcType, outType, bytesPerPixel](Call call) {
      return [s, srcType, outType, bytesPerPixel, call](benchmark::State& state) {
        Images im(s, srcType, outType);
        for (auto _ : state) {
          call(im);
          benchmark::ClobberMemory();
        }
        state.SetBytesProcessed(int64_t(state.iterations()) * bytesPerPixel * s.width * s.height);
      };
    };
    zelbench::registerPair(family, name + "/" + s.name, run(zelcvCall), run(opencvCall));
  }
}

constexpr float kAlpha = 0.125f;

void registerArith() {
  // ---- accumulate: 8u sources into a 32f accumulator ----
  addCase("accumulate", "Add_8u32f_C1IR", CV_8UC1, CV_32FC1, 9,
          [](Images& m) { zeliAdd_8u32f_C1IR(in<Zel8u>(m.src1), stepOf(m.src1), m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out)); },
          [](Images& m) { cv::accumulate(m.src1, m.out); });
  addCase("accumulate", "AddSquare_8u32f_C1IR", CV_8UC1, CV_32FC1, 9,
          [](Images& m) { zeliAddSquare_8u32f_C1IR(in<Zel8u>(m.src1), stepOf(m.src1), m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out)); },
          [](Images& m) { cv::accumulateSquare(m.src1, m.out); });
  addCase("accumulate", "AddProduct_8u32f_C1IR", CV_8UC1, CV_32FC1, 10,
          [](Images& m) {
            zeliAddProduct_8u32f_C1IR(in<Zel8u>(m.src1), stepOf(m.src1), in<Zel8u>(m.src2), stepOf(m.src2),
                                      m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out));
          },
          [](Images& m) { cv::accumulateProduct(m.src1, m.src2, m.out); });
  addCase("accumulate", "AddProduct_8u32f_C1IMR", CV_8UC1, CV_32FC1, 11,
          [](Images& m) {
            zeliAddProduct_8u32f_C1IMR(in<Zel8u>(m.src1), stepOf(m.src1), in<Zel8u>(m.src2), stepOf(m.src2),
                                       in<Zel8u>(m.mask), stepOf(m.mask), m.out.ptr<Zel32f>(), stepOf(m.out),
                                       roiOf(m.out));
          },
          [](Images& m) { cv::accumulateProduct(m.src1, m.src2, m.out, m.mask); });
  addCase("accumulate", "AddWeighted_8u32f_C1IR", CV_8UC1, CV_32FC1, 9,
          [](Images& m) {
            const cv::Mat& f = m.frame();
            zeliAddWeighted_8u32f_C1IR(in<Zel8u>(f), stepOf(f), m.out.ptr<Zel32f>(), stepOf(m.out),
                                       roiOf(m.out), kAlpha);
          },
          [](Images& m) { cv::accumulateWeighted(m.frame(), m.out, kAlpha); });
  addCase("accumulate", "AddWeighted_8u32f_C1IMR", CV_8UC1, CV_32FC1, 10,
          [](Images& m) {
            const cv::Mat& f = m.frame();
            zeliAddWeighted_8u32f_C1IMR(in<Zel8u>(f), stepOf(f), in<Zel8u>(m.mask), stepOf(m.mask),
                                        m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out), kAlpha);
          },
          [](Images& m) { cv::accumulateWeighted(m.frame(), m.out, kAlpha, m.mask); });

  // ---- accumulate: 32f sources (Add exists only masked) ----
  addCase("accumulate", "Add_32f_C1IMR", CV_32FC1, CV_32FC1, 13,
          [](Images& m) {
            zeliAdd_32f_C1IMR(in<Zel32f>(m.src1), stepOf(m.src1), in<Zel8u>(m.mask), stepOf(m.mask),
                              m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out));
          },
          [](Images& m) { cv::accumulate(m.src1, m.out, m.mask); });
  addCase("accumulate", "AddSquare_32f_C1IR", CV_32FC1, CV_32FC1, 12,
          [](Images& m) { zeliAddSquare_32f_C1IR(in<Zel32f>(m.src1), stepOf(m.src1), m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out)); },
          [](Images& m) { cv::accumulateSquare(m.src1, m.out); });
  addCase("accumulate", "AddProduct_32f_C1IR", CV_32FC1, CV_32FC1, 16,
          [](Images& m) {
            zeliAddProduct_32f_C1IR(in<Zel32f>(m.src1), stepOf(m.src1), in<Zel32f>(m.src2), stepOf(m.src2),
                                    m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out));
          },
          [](Images& m) { cv::accumulateProduct(m.src1, m.src2, m.out); });
  addCase("accumulate", "AddProduct_32f_C1IMR", CV_32FC1, CV_32FC1, 17,
          [](Images& m) {
            zeliAddProduct_32f_C1IMR(in<Zel32f>(m.src1), stepOf(m.src1), in<Zel32f>(m.src2), stepOf(m.src2),
                                     in<Zel8u>(m.mask), stepOf(m.mask), m.out.ptr<Zel32f>(), stepOf(m.out),
                                     roiOf(m.out));
          },
          [](Images& m) { cv::accumulateProduct(m.src1, m.src2, m.out, m.mask); });
  addCase("accumulate", "AddWeighted_32f_C1IR", CV_32FC1, CV_32FC1, 12,
          [](Images& m) {
            const cv::Mat& f = m.frame();
            zeliAddWeighted_32f_C1IR(in<Zel32f>(f), stepOf(f), m.out.ptr<Zel32f>(), stepOf(m.out),
                                     roiOf(m.out), kAlpha);
          },
          [](Images& m) { cv::accumulateWeighted(m.frame(), m.out, kAlpha); });
  addCase("accumulate", "AddWeighted_32f_C1IMR", CV_32FC1, CV_32FC1, 13,
          [](Images& m) {
            const cv::Mat& f = m.frame();
            zeliAddWeighted_32f_C1IMR(in<Zel32f>(f), stepOf(f), in<Zel8u>(m.mask), stepOf(m.mask),
                                      m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out), kAlpha);
          },
          [](Images& m) { cv::accumulateWeighted(m.frame(), m.out, kAlpha, m.mask); });

  // ---- accumulate: 16u sources, and the running average into another image ----
  addCase("accumulate", "Add_16u32f_C1IR", CV_16UC1, CV_32FC1, 10,
          [](Images& m) { zeliAdd_16u32f_C1IR(in<Zel16u>(m.src1), stepOf(m.src1), m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out)); },
          [](Images& m) { cv::accumulate(m.src1, m.out); });
  addCase("accumulate", "AddProduct_16u32f_C1IMR", CV_16UC1, CV_32FC1, 13,
          [](Images& m) {
            zeliAddProduct_16u32f_C1IMR(in<Zel16u>(m.src1), stepOf(m.src1), in<Zel16u>(m.src2), stepOf(m.src2),
                                        in<Zel8u>(m.mask), stepOf(m.mask), m.out.ptr<Zel32f>(), stepOf(m.out),
                                        roiOf(m.out));
          },
          [](Images& m) { cv::accumulateProduct(m.src1, m.src2, m.out, m.mask); });
  addCase("accumulate", "AddWeighted_16u32f_C1IR", CV_16UC1, CV_32FC1, 10,
          [](Images& m) {
            const cv::Mat& f = m.frame();
            zeliAddWeighted_16u32f_C1IR(in<Zel16u>(f), stepOf(f), m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out),
                                        kAlpha);
          },
          [](Images& m) { cv::accumulateWeighted(m.frame(), m.out, kAlpha); });
  // The comparison library blends with two weights; the same job.
  addCase("accumulate", "AddWeighted_32f_C1R", CV_32FC1, CV_32FC1, 12,
          [](Images& m) {
            zeliAddWeighted_32f_C1R(in<Zel32f>(m.src1), stepOf(m.src1), in<Zel32f>(m.src2), stepOf(m.src2),
                                    m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out), kAlpha);
          },
          [](Images& m) { cv::addWeighted(m.src1, kAlpha, m.src2, 1.0 - kAlpha, 0.0, m.out); });

  // ---- absdiff ----
  addCase("absdiff", "AbsDiff_16u_C1R", CV_16UC1, CV_16UC1, 6,
          [](Images& m) {
            zeliAbsDiff_16u_C1R(in<Zel16u>(m.src1), stepOf(m.src1), in<Zel16u>(m.src2), stepOf(m.src2),
                                m.out.ptr<Zel16u>(), stepOf(m.out), roiOf(m.out));
          },
          [](Images& m) { cv::absdiff(m.src1, m.src2, m.out); });
  addCase("absdiff", "AbsDiff_8u_C3R", CV_8UC3, CV_8UC3, 9,
          [](Images& m) {
            zeliAbsDiff_8u_C3R(in<Zel8u>(m.src1), stepOf(m.src1), in<Zel8u>(m.src2), stepOf(m.src2),
                               m.out.ptr<Zel8u>(), stepOf(m.out), roiOf(m.out));
          },
          [](Images& m) { cv::absdiff(m.src1, m.src2, m.out); });
  addCase("absdiff", "AbsDiff_8u_C1R", CV_8UC1, CV_8UC1, 3,
          [](Images& m) {
            zeliAbsDiff_8u_C1R(in<Zel8u>(m.src1), stepOf(m.src1), in<Zel8u>(m.src2), stepOf(m.src2),
                               m.out.ptr<Zel8u>(), stepOf(m.out), roiOf(m.out));
          },
          [](Images& m) { cv::absdiff(m.src1, m.src2, m.out); });
  addCase("absdiff", "AbsDiff_32f_C1R", CV_32FC1, CV_32FC1, 12,
          [](Images& m) {
            zeliAbsDiff_32f_C1R(in<Zel32f>(m.src1), stepOf(m.src1), in<Zel32f>(m.src2), stepOf(m.src2),
                                m.out.ptr<Zel32f>(), stepOf(m.out), roiOf(m.out));
          },
          [](Images& m) { cv::absdiff(m.src1, m.src2, m.out); });
  addCase("absdiff", "AbsDiffC_8u_C1R", CV_8UC1, CV_8UC1, 2,
          [](Images& m) { zeliAbsDiffC_8u_C1R(in<Zel8u>(m.src1), stepOf(m.src1), m.out.ptr<Zel8u>(), stepOf(m.out), roiOf(m.out), 100); },
          [](Images& m) { cv::absdiff(m.src1, cv::Scalar(100), m.out); });
  addCase("absdiff", "AbsDiffC_32f_C1R", CV_32FC1, CV_32FC1, 8,
          [](Images& m) {
            zeliAbsDiffC_32f_C1R(in<Zel32f>(m.src1), stepOf(m.src1), m.out.ptr<Zel32f>(), stepOf(m.out),
                                 roiOf(m.out), 100.0f);
          },
          [](Images& m) { cv::absdiff(m.src1, cv::Scalar(100.0), m.out); });
}

zelbench::Registrar registrar(&registerArith);

}  // namespace
