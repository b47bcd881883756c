// The derivative and smoothing filters against OpenCV where the definitions
// coincide:
// - 8u16s Sobel, Scharr and Laplacian: cv::Sobel / cv::Scharr / cv::Laplacian
//   into CV_16S are the same exact integer sums (NegVert is -cv::Sobel(1, 0)).
//   OpenCV's Sobel has no border value, so the constant kind is compared
//   with 0; wrap is left out (OpenCV's filters refuse it).
// - 8u8s: the same sums, then our documented scaling (OpenCV has no such
//   output), applied to OpenCV's 16S result.
// - Box lowpass 8u: cv::blur rounds the same mean to nearest: equal.
// - 32f members, cv::blur and cv::GaussianBlur 32f: OpenCV adds in another
//   order (and for blur in double), so results agree to a few units in the
//   last place, not bit for bit.
// - The Gaussian filter: our taps are cv::getGaussianKernel's (compared
//   exactly where OpenCV computes them the same way). For 8u and 16u images
//   cv::GaussianBlur uses its own fixed-point arithmetic while we round a
//   float sum, so the results differ by up to two units.
// - GenSobelKernel: cv::getDerivKernels without normalisation, exactly.
#include <gtest/gtest.h>

#include <opencv2/imgproc.hpp>
#include <random>
#include <string>
#include <vector>

#include "zelcv.h"

namespace {

struct BorderPair {
  int ours, cv;
};
const BorderPair kBorders[] = {{zelBorderConstant, cv::BORDER_CONSTANT},
                               {zelBorderReplicate, cv::BORDER_REPLICATE},
                               {zelBorderMirror, cv::BORDER_REFLECT_101},
                               {zelBorderMirrorWithEdge, cv::BORDER_REFLECT}};

cv::Mat randomImage(std::mt19937& rng, int w, int h, int type) {
  cv::Mat m(h, w, type);
  cv::randu(m, cv::Scalar::all(0), cv::Scalar::all(type == CV_32F ? 1.0 : 256.0));
  (void)rng;
  return m;
}

using Filter8u16s = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, Zel16s*, int, ZeliSize, int, ZeliBorderType, Zel8u,
                                           Zel8u*);
using Filter8u8s = ZelStatus(ZELCV_CALL*)(const Zel8u*, int, Zel8s*, int, ZeliSize, int, ZeliBorderType, Zel8u,
                                          Zel8u*);
using Filter32f = ZelStatus(ZELCV_CALL*)(const Zel32f*, int, Zel32f*, int, ZeliSize, int, ZeliBorderType, Zel32f,
                                         Zel8u*);
using Query = ZelStatus(ZELCV_CALL*)(ZeliSize, int, int*);

// What OpenCV computes for a member: cv::Sobel(dx, dy), cv::Scharr(dx, dy)
// or cv::Laplacian, and a sign.
struct Op {
  std::string name;
  enum { kSobel, kScharr, kLaplacian } kind;
  int dx, dy, sign;
  Filter8u16s f16;
  Query q16;
  Filter8u8s f8;
  Query q8;
  int shift3, shift5;
  Filter32f f32;
  Query q32;
};

cv::Mat opencv(const Op& op, const cv::Mat& src, int depth, int ksize, int border) {
  cv::Mat out;
  if (op.kind == Op::kSobel) cv::Sobel(src, out, depth, op.dx, op.dy, ksize, 1, 0, border);
  else if (op.kind == Op::kScharr) cv::Scharr(src, out, depth, op.dx, op.dy, 1, 0, border);
  else cv::Laplacian(src, out, depth, ksize, 1, 0, border);
  if (op.sign < 0) out = -out;
  return out;
}

std::vector<Op> ops() {
  return {
      {"SobelHoriz", Op::kSobel, 0, 1, 1, nullptr, nullptr, zeliFilterSobelHorizBorder_8u8s_C1R,
       zeliFilterSobelHorizGetBufferSize_8u8s_C1R, 3, 7, nullptr, nullptr},
      {"SobelVert", Op::kSobel, 1, 0, 1, nullptr, nullptr, zeliFilterSobelVertBorder_8u8s_C1R,
       zeliFilterSobelVertGetBufferSize_8u8s_C1R, 3, 7, nullptr, nullptr},
      {"SobelNegVert", Op::kSobel, 1, 0, -1, zeliFilterSobelNegVertBorder_8u16s_C1R,
       zeliFilterSobelNegVertGetBufferSize_8u16s_C1R, zeliFilterSobelNegVertBorder_8u8s_C1R,
       zeliFilterSobelNegVertGetBufferSize_8u8s_C1R, 3, 7, zeliFilterSobelNegVertBorder_32f_C1R,
       zeliFilterSobelNegVertGetBufferSize_32f_C1R},
      {"SobelHorizSecond", Op::kSobel, 0, 2, 1, zeliFilterSobelHorizSecondBorder_8u16s_C1R,
       zeliFilterSobelHorizSecondGetBufferSize_8u16s_C1R, zeliFilterSobelHorizSecondBorder_8u8s_C1R,
       zeliFilterSobelHorizSecondGetBufferSize_8u8s_C1R, 4, 6, zeliFilterSobelHorizSecondBorder_32f_C1R,
       zeliFilterSobelHorizSecondGetBufferSize_32f_C1R},
      {"SobelVertSecond", Op::kSobel, 2, 0, 1, zeliFilterSobelVertSecondBorder_8u16s_C1R,
       zeliFilterSobelVertSecondGetBufferSize_8u16s_C1R, zeliFilterSobelVertSecondBorder_8u8s_C1R,
       zeliFilterSobelVertSecondGetBufferSize_8u8s_C1R, 4, 6, zeliFilterSobelVertSecondBorder_32f_C1R,
       zeliFilterSobelVertSecondGetBufferSize_32f_C1R},
      {"SobelCross", Op::kSobel, 1, 1, 1, zeliFilterSobelCrossBorder_8u16s_C1R,
       zeliFilterSobelCrossGetBufferSize_8u16s_C1R, zeliFilterSobelCrossBorder_8u8s_C1R,
       zeliFilterSobelCrossGetBufferSize_8u8s_C1R, 2, 6, zeliFilterSobelCrossBorder_32f_C1R,
       zeliFilterSobelCrossGetBufferSize_32f_C1R},
      {"ScharrHoriz", Op::kScharr, 0, 1, 1, zeliFilterScharrHorizBorder_8u16s_C1R,
       zeliFilterScharrHorizGetBufferSize_8u16s_C1R, zeliFilterScharrHorizBorder_8u8s_C1R,
       zeliFilterScharrHorizGetBufferSize_8u8s_C1R, 5, 0, zeliFilterScharrHorizBorder_32f_C1R,
       zeliFilterScharrHorizGetBufferSize_32f_C1R},
      {"ScharrVert", Op::kScharr, 1, 0, 1, zeliFilterScharrVertBorder_8u16s_C1R,
       zeliFilterScharrVertGetBufferSize_8u16s_C1R, zeliFilterScharrVertBorder_8u8s_C1R,
       zeliFilterScharrVertGetBufferSize_8u8s_C1R, 5, 0, zeliFilterScharrVertBorder_32f_C1R,
       zeliFilterScharrVertGetBufferSize_32f_C1R},
      {"Laplacian", Op::kLaplacian, 0, 0, 1, zeliFilterLaplacianBorder_8u16s_C1R,
       zeliFilterLaplacianGetBufferSize_8u16s_C1R, zeliFilterLaplacianBorder_8u8s_C1R,
       zeliFilterLaplacianGetBufferSize_8u8s_C1R, 4, 7, zeliFilterLaplacianBorder_32f_C1R,
       zeliFilterLaplacianGetBufferSize_32f_C1R},
  };
}

std::vector<Zel8u> bufferFor(Query q, ZeliSize roi, int mask) {
  int bytes = 0;
  EXPECT_EQ(q(roi, mask, &bytes), zelStatusOk);
  return std::vector<Zel8u>(size_t(bytes));
}

TEST(FiltersConformity, DerivativesMatchOpenCV) {
  std::mt19937 rng(5);
  for (const Op& op : ops())
    for (int ksize : {3, 5}) {
      if (ksize == 5 && op.kind == Op::kScharr) continue;
      const int mask = ksize == 5 ? zelMaskSize5x5 : zelMaskSize3x3;
      for (const BorderPair& b : kBorders)
        for (ZeliSize roi : {ZeliSize{37, 11}, ZeliSize{160, 24}, ZeliSize{3, 2}}) {
          SCOPED_TRACE(op.name + " " + std::to_string(ksize) + " border " + std::to_string(b.ours) + " width " +
                       std::to_string(roi.width));
          const cv::Mat src = randomImage(rng, roi.width, roi.height, CV_8U);
          const cv::Mat ref = opencv(op, src, CV_16S, ksize, b.cv);
          if (op.f16) {
            cv::Mat out(roi.height, roi.width, CV_16S);
            auto buffer = bufferFor(op.q16, roi, mask);
            ASSERT_EQ(op.f16(src.ptr<Zel8u>(), int(src.step), out.ptr<Zel16s>(), int(out.step), roi, mask, b.ours, 0,
                             buffer.data()),
                      zelStatusOk);
            ASSERT_EQ(cv::norm(out, ref, cv::NORM_INF), 0.0);
          }
          {
            cv::Mat out(roi.height, roi.width, CV_8S);
            auto buffer = bufferFor(op.q8, roi, mask);
            ASSERT_EQ(op.f8(src.ptr<Zel8u>(), int(src.step), out.ptr<Zel8s>(), int(out.step), roi, mask, b.ours, 0,
                            buffer.data()),
                      zelStatusOk);
            const int s = ksize == 5 ? op.shift5 : op.shift3;
            for (int y = 0; y < roi.height; ++y)
              for (int x = 0; x < roi.width; ++x) {
                const int v = (ref.at<short>(y, x) + (1 << (s - 1))) >> s;
                ASSERT_EQ(out.at<schar>(y, x), std::min(127, std::max(-128, v))) << x << "," << y;
              }
          }
          if (op.f32) {
            const cv::Mat srcf = randomImage(rng, roi.width, roi.height, CV_32F);
            const cv::Mat reff = opencv(op, srcf, CV_32F, ksize, b.cv);
            cv::Mat out(roi.height, roi.width, CV_32F);
            auto buffer = bufferFor(op.q32, roi, mask);
            ASSERT_EQ(op.f32(srcf.ptr<Zel32f>(), int(srcf.step), out.ptr<Zel32f>(), int(out.step), roi, mask, b.ours,
                             0.0f, buffer.data()),
                      zelStatusOk);
            ASSERT_LE(cv::norm(out, reff, cv::NORM_INF), 1e-4);
          }
        }
    }
}

TEST(FiltersConformity, LowpassAndFixedGaussMatchOpenCV) {
  std::mt19937 rng(6);
  for (int ksize : {3, 5})
    for (const BorderPair& b : kBorders)
      for (ZeliSize roi : {ZeliSize{41, 13}, ZeliSize{200, 9}, ZeliSize{2, 3}}) {
        SCOPED_TRACE(std::to_string(ksize) + " border " + std::to_string(b.ours));
        const int mask = ksize == 5 ? zelMaskSize5x5 : zelMaskSize3x3;
        const cv::Mat src = randomImage(rng, roi.width, roi.height, CV_8U);
        cv::Mat ref, out(roi.height, roi.width, CV_8U);
        cv::blur(src, ref, cv::Size(ksize, ksize), cv::Point(-1, -1), b.cv);
        auto buffer = bufferFor(zeliFilterLowpassGetBufferSize_8u_C1R, roi, mask);
        ASSERT_EQ(zeliFilterLowpassBorder_8u_C1R(src.ptr<Zel8u>(), int(src.step), out.ptr<Zel8u>(), int(out.step), roi,
                                                 mask, b.ours, 0, buffer.data()),
                  zelStatusOk);
        EXPECT_EQ(cv::norm(out, ref, cv::NORM_INF), 0.0);

        const cv::Mat srcf = randomImage(rng, roi.width, roi.height, CV_32F);
        cv::Mat reff, outf(roi.height, roi.width, CV_32F);
        cv::blur(srcf, reff, cv::Size(ksize, ksize), cv::Point(-1, -1), b.cv);
        buffer = bufferFor(zeliFilterLowpassGetBufferSize_32f_C1R, roi, mask);
        ASSERT_EQ(zeliFilterLowpassBorder_32f_C1R(srcf.ptr<Zel32f>(), int(srcf.step), outf.ptr<Zel32f>(),
                                                  int(outf.step), roi, mask, b.ours, 0.0f, buffer.data()),
                  zelStatusOk);
        EXPECT_LE(cv::norm(outf, reff, cv::NORM_INF), 1e-6);

        cv::GaussianBlur(srcf, reff, cv::Size(ksize, ksize), 0, 0, b.cv);
        buffer = bufferFor(zeliFilterGaussGetBufferSize_32f_C1R, roi, mask);
        ASSERT_EQ(zeliFilterGaussBorder_32f_C1R(srcf.ptr<Zel32f>(), int(srcf.step), outf.ptr<Zel32f>(), int(outf.step),
                                                roi, mask, b.ours, 0.0f, buffer.data()),
                  zelStatusOk);
        EXPECT_LE(cv::norm(outf, reff, cv::NORM_INF), 1e-6);
      }
}

// The taps a state holds, read back through a one-pixel impulse response.
TEST(FiltersConformity, GaussianMatchesGetGaussianKernelAndGaussianBlur) {
  std::mt19937 rng(8);
  int tapMismatches = 0, tapCount = 0;
  for (int k = 3; k <= 15; k += 2)
    for (float sigma : {0.0f, 0.5f, 0.8f, 1.0f, 1.3f, 2.0f, 3.7f, 6.0f}) {
      SCOPED_TRACE("k " + std::to_string(k) + " sigma " + std::to_string(sigma));
      const ZeliSize roi{2 * k + 1, 1};
      int st = 0, bu = 0;
      ASSERT_EQ(zeliFilterGaussianGetBufferSize(roi, k, zel32f, 1, &st, &bu), zelStatusOk);
      std::vector<Zel8u> state(static_cast<size_t>(st)), buffer(static_cast<size_t>(bu));
      auto* gaussian = reinterpret_cast<ZeliFilterGaussianState*>(state.data());
      ASSERT_EQ(zeliFilterGaussianInit(roi, sigma, k, zel32f, 1, gaussian), zelStatusOk);
      std::vector<Zel32f> impulse(size_t(roi.width), 0.0f), out(static_cast<size_t>(roi.width));
      impulse[size_t(k)] = 1.0f;
      // One row with the constant border: the column pass sees the centre tap
      // times the row response, so divide it out.
      ASSERT_EQ(zeliFilterGaussianBorder_32f_C1R(impulse.data(), roi.width * 4, out.data(), roi.width * 4, roi,
                                                 zelBorderConstant, 0.0f, gaussian, buffer.data()),
                zelStatusOk);
      const cv::Mat cvTaps = cv::getGaussianKernel(k, sigma, CV_32F);
      const float centre = cvTaps.at<float>(k / 2);
      for (int i = 0; i < k; ++i) {
        const float ours = out[size_t(k + k / 2 - i)];
        const float expected = float(double(cvTaps.at<float>(i)) * centre);
        ++tapCount;
        if (ours != expected) ++tapMismatches;
      }
      // Whole images: OpenCV smooths 8u in its own fixed point; within two units.
      const ZeliSize img{57, 19};
      ASSERT_EQ(zeliFilterGaussianGetBufferSize(img, k, zel8u, 3, &st, &bu), zelStatusOk);
      state.assign(size_t(st), 0);
      buffer.assign(size_t(bu), 0);
      ASSERT_EQ(zeliFilterGaussianInit(img, sigma, k, zel8u, 3, gaussian), zelStatusOk);
      const cv::Mat src = randomImage(rng, img.width, img.height, CV_8UC3);
      cv::Mat ref, dst(img.height, img.width, CV_8UC3);
      cv::GaussianBlur(src, ref, cv::Size(k, k), sigma, sigma, cv::BORDER_REFLECT_101);
      const Zel8u zero[3] = {0, 0, 0};
      ASSERT_EQ(zeliFilterGaussianBorder_8u_C3R(src.ptr<Zel8u>(), int(src.step), dst.ptr<Zel8u>(), int(dst.step), img,
                                                zelBorderMirror, zero, gaussian, buffer.data()),
                zelStatusOk);
      EXPECT_LE(cv::norm(dst, ref, cv::NORM_INF), 2.0);
    }
  // Each response value is one rounding of (tap x centre tap): equal exactly
  // when the taps are.
  EXPECT_EQ(tapMismatches, 0) << "of " << tapCount;
}

TEST(FiltersConformity, GenSobelKernelMatchesGetDerivKernels) {
  for (int k = 3; k <= 31; k += 2)
    for (int order = 0; order < std::min(k, 4); ++order) {
      cv::Mat kx, ky;
      cv::getDerivKernels(kx, ky, order, order == 0 ? 1 : 0, k, false, CV_32F);  // OpenCV wants some derivative
      std::vector<Zel32f> ours(static_cast<size_t>(k));
      ASSERT_EQ(zeliGenSobelKernel_32f(ours.data(), k, order), zelStatusOk);
      for (int i = 0; i < k; ++i) EXPECT_EQ(ours[size_t(i)], kx.at<float>(i)) << k << " " << order << " " << i;
    }
}

}  // namespace
