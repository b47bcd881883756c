// Reconstruction against the loop an OpenCV user writes (3x3 dilation or a
// cross for 4 neighbours, minimum with the mask, until no pixel changes; the
// dual for erosion), and grey dilation and erosion by flat functions against
// cv::dilate and cv::erode with the replicated border. OpenCV's loop starts
// from the marker as given; ours first limits the marker by the mask, so
// the markers here start below (above) the mask.
#include <gtest/gtest.h>

#include <limits>
#include <vector>

#include <opencv2/imgproc.hpp>

#include "zelcv.h"

namespace {

cv::Mat opencvReconstruct(bool dilate, cv::Mat marker, const cv::Mat& mask, bool eight) {
  const cv::Mat kernel = cv::getStructuringElement(eight ? cv::MORPH_RECT : cv::MORPH_CROSS, cv::Size(3, 3));
  cv::Mat next, changed;
  for (;;) {
    if (dilate) {
      cv::dilate(marker, next, kernel);
      cv::min(next, mask, next);
    } else {
      cv::erode(marker, next, kernel);
      cv::max(next, mask, next);
    }
    cv::compare(next, marker, changed, cv::CMP_NE);
    if (cv::countNonZero(changed) == 0) return next;
    cv::swap(marker, next);
  }
}

template <typename T, typename Op>
void checkReconstruct(int cvType, Op dilateOp, Op erodeOp, ZelDataType code) {
  cv::RNG rng(2024 + cvType);
  for (int iter = 0; iter < 60; ++iter) {
    SCOPED_TRACE(iter);
    const int w = rng.uniform(1, 120), h = rng.uniform(1, 90);
    const bool dilate = iter % 2 == 0, eight = iter % 4 < 2;
    cv::Mat mask(h, w, cvType), noise(h, w, cvType);
    // Coarse levels, so that plateaus and ties are common.
    rng.fill(mask, cv::RNG::UNIFORM, 0, 8);
    mask.convertTo(mask, cvType, std::is_same<T, Zel8u>::value ? 30 : (std::is_same<T, Zel16u>::value ? 8000 : 0.5));
    cv::Mat marker;
    if (iter % 3 == 0) {
      // A single seed.
      marker = cv::Mat(h, w, cvType, cv::Scalar(dilate ? 0 : 65535));
      marker.at<T>(rng.uniform(0, h), rng.uniform(0, w)) = dilate ? std::numeric_limits<T>::max() : T(0);
    } else {
      rng.fill(noise, cv::RNG::UNIFORM, 0, 3);
      noise.convertTo(noise, cvType, std::is_same<T, Zel8u>::value ? 40 : 9000);
      if (dilate)
        cv::subtract(mask, noise, marker);
      else
        cv::add(mask, noise, marker);
    }
    if (dilate)
      cv::min(marker, mask, marker);
    else
      cv::max(marker, mask, marker);
    const cv::Mat want = opencvReconstruct(dilate, marker.clone(), mask, eight);
    int size = 0;
    ASSERT_EQ(zeliMorphReconstructGetBufferSize({w, h}, code, &size), zelStatusOk);
    std::vector<Zel8u> buffer(static_cast<size_t>(size));
    cv::Mat got = marker.clone();
    ASSERT_EQ((dilate ? dilateOp : erodeOp)(reinterpret_cast<T*>(got.data), int(got.step[0]),
                                            reinterpret_cast<const T*>(mask.data), int(mask.step[0]), {w, h},
                                            eight ? zelNormInf : zelNormL1, buffer.data()),
              zelStatusOk);
    cv::Mat diff;
    cv::compare(got, want, diff, cv::CMP_NE);
    EXPECT_EQ(cv::countNonZero(diff), 0) << w << "x" << h << (dilate ? " dilation " : " erosion ")
                                         << (eight ? 8 : 4);
  }
}

TEST(GrayMorphConformity, ReconstructionMatchesTheGeodesicLoop) {
  checkReconstruct<Zel8u>(CV_8UC1, zeliMorphReconstructDilate_8u_C1IR, zeliMorphReconstructErode_8u_C1IR, zel8u);
  checkReconstruct<Zel16u>(CV_16UC1, zeliMorphReconstructDilate_16u_C1IR, zeliMorphReconstructErode_16u_C1IR,
                           zel16u);
  checkReconstruct<Zel32f>(CV_32FC1, zeliMorphReconstructDilate_32f_C1IR, zeliMorphReconstructErode_32f_C1IR,
                           zel32f);
}

TEST(GrayMorphConformity, FlatFunctionsMatchOpenCVMorphology) {
  cv::RNG rng(7);
  for (int iter = 0; iter < 60; ++iter) {
    SCOPED_TRACE(iter);
    const int w = rng.uniform(1, 150), h = rng.uniform(1, 60), mw = rng.uniform(1, 8), mh = rng.uniform(1, 8);
    cv::Mat element(mh, mw, CV_8UC1);
    rng.fill(element, cv::RNG::UNIFORM, 0, 2);
    element.at<uchar>(rng.uniform(0, mh), rng.uniform(0, mw)) = 1;
    const cv::Point anchor(rng.uniform(0, mw), rng.uniform(0, mh));
    const bool floats = iter % 2 == 1;
    cv::Mat src(h, w, floats ? CV_32FC1 : CV_8UC1);
    rng.fill(src, cv::RNG::UNIFORM, 0, 256);
    std::vector<Zel32s> f8(size_t(mw * mh));
    std::vector<Zel32f> f32(f8.size());
    for (int k = 0; k < mw * mh; ++k) {
      const bool on = element.data[k] != 0;
      f8[size_t(k)] = on ? 0 : -1000;
      f32[size_t(k)] = on ? 0.0f : -std::numeric_limits<float>::infinity();
    }
    int size = 0;
    std::vector<uint8_t> block;
    auto* st = reinterpret_cast<ZeliMorphGrayState*>(0);
    if (floats) {
      ASSERT_EQ(zeliMorphGrayGetSize_32f_C1R(w, {mw, mh}, &size), zelStatusOk);
      block.resize(size_t(size));
      st = reinterpret_cast<ZeliMorphGrayState*>(block.data());
      ASSERT_EQ(zeliMorphGrayInit_32f_C1R(w, f32.data(), {mw, mh}, {anchor.x, anchor.y}, st), zelStatusOk);
    } else {
      ASSERT_EQ(zeliMorphGrayGetSize_8u_C1R(w, {mw, mh}, &size), zelStatusOk);
      block.resize(size_t(size));
      st = reinterpret_cast<ZeliMorphGrayState*>(block.data());
      ASSERT_EQ(zeliMorphGrayInit_8u_C1R(w, f8.data(), {mw, mh}, {anchor.x, anchor.y}, st), zelStatusOk);
    }
    for (bool dilate : {true, false}) {
      cv::Mat want, got(h, w, src.type());
      if (dilate)
        cv::dilate(src, want, element, anchor, 1, cv::BORDER_REPLICATE);
      else
        cv::erode(src, want, element, anchor, 1, cv::BORDER_REPLICATE);
      ZelStatus s;
      if (floats)
        s = (dilate ? zeliGrayDilateBorder_32f_C1R : zeliGrayErodeBorder_32f_C1R)(
            reinterpret_cast<const Zel32f*>(src.data), int(src.step[0]), reinterpret_cast<Zel32f*>(got.data),
            int(got.step[0]), {w, h}, zelBorderReplicate, st);
      else
        s = (dilate ? zeliGrayDilateBorder_8u_C1R : zeliGrayErodeBorder_8u_C1R)(
            src.data, int(src.step[0]), got.data, int(got.step[0]), {w, h}, zelBorderReplicate, st);
      ASSERT_EQ(s, zelStatusOk);
      cv::Mat diff;
      cv::compare(got, want, diff, cv::CMP_NE);
      EXPECT_EQ(cv::countNonZero(diff), 0) << (dilate ? "dilation " : "erosion ") << mw << "x" << mh;
    }
  }
}

}  // namespace
