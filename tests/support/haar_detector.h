// A cascade detector at one scale built from the library's calls: the
// integral and squared integral of the picture, the deviation of every
// window's inner rectangle, and the converted stages applied one after the
// other on one mask. Used by the conformity tests, the benchmark and the
// example program.
#ifndef ZELCV_TESTS_HAAR_DETECTOR_H
#define ZELCV_TESTS_HAAR_DETECTOR_H

#include <cstdint>
#include <vector>

#include "support/haar_cascade.h"
#include "zelcv.h"

namespace zeltest {

class HaarDetector {
 public:
  // Builds 32s classifiers (exact integer features) when every weight is an
  // integer, 32f ones otherwise. Tilted cascades are not handled here.
  explicit HaarDetector(const HaarCascade& cascade) : cascade_(cascade) {
    for (const HaarStage& s : cascade.stages) {
      const int n = int(s.counts.size());
      if (cascade.integerWeights) {
        ZeliHaarClassifier_32s* c = nullptr;
        ok_ = ok_ && zeliHaarClassifierInitAlloc_32s(&c, s.rects.data(), s.intWeights.data(), s.thresholds.data(),
                                                     s.below.data(), s.above.data(), s.counts.data(), n) == 0;
        stages32s_.push_back(c);
      } else {
        ZeliHaarClassifier_32f* c = nullptr;
        ok_ = ok_ && zeliHaarClassifierInitAlloc_32f(&c, s.rects.data(), s.weights.data(), s.thresholds.data(),
                                                     s.below.data(), s.above.data(), s.counts.data(), n) == 0;
        stages32f_.push_back(c);
      }
    }
  }
  ~HaarDetector() {
    for (ZeliHaarClassifier_32s* c : stages32s_)
      if (c) zeliHaarClassifierFree_32s(c);
    for (ZeliHaarClassifier_32f* c : stages32f_)
      if (c) zeliHaarClassifierFree_32f(c);
  }
  HaarDetector(const HaarDetector&) = delete;
  HaarDetector& operator=(const HaarDetector&) = delete;

  bool ok() const { return ok_; }

  // Windows of a W x H picture: (W - width + 1) x (H - height + 1) origins.
  ZeliSize windows(int W, int H) const { return {W - cascade_.width + 1, H - cascade_.height + 1}; }

  // Evaluates the windows on a grid of `gridStep` whose inner rectangle's
  // deviation exceeds minDeviation. mask (one byte per window, row step
  // windows.width) ends non-zero where every stage accepted; afterStage[i]
  // is the count of live windows after stage i. Returns false on a failed
  // call.
  bool run(const uint8_t* image, int imageStep, int W, int H, int gridStep, float minDeviation,
           std::vector<uint8_t>& mask, std::vector<int>* afterStage = nullptr,
           std::vector<uint8_t>* firstStage = nullptr) {
    const ZeliSize roi = windows(W, H);
    if (roi.width < 1 || roi.height < 1) return false;
    sumStep_ = 4 * (W + 1);
    sum_.resize(size_t(W + 1) * (H + 1));
    sqr_.resize(size_t(W + 1) * (H + 1));
    sumF_.resize(cascade_.integerWeights ? 0 : sum_.size());
    norm_.resize(size_t(roi.width) * roi.height);
    if (zeliSqrIntegral_8u32s64f_C1R(image, imageStep, sum_.data(), sumStep_, sqr_.data(), 8 * (W + 1), {W, H}, 0,
                                     0.0))
      return false;
    if (zeliRectStdDev_32s32f_C1R(sum_.data(), sumStep_, sqr_.data(), 8 * (W + 1), norm_.data(), 4 * roi.width,
                                  roi, cascade_.normRect()))
      return false;
    if (!cascade_.integerWeights) {
      for (size_t i = 0; i < sum_.size(); ++i) sumF_[i] = Zel32f(sum_[i]);
    }
    mask.assign(size_t(roi.width) * roi.height, 0);
    for (int y = 0; y < roi.height; y += gridStep)
      for (int x = 0; x < roi.width; x += gridStep)
        mask[size_t(y) * roi.width + x] = norm_[size_t(y) * roi.width + x] > minDeviation;
    if (afterStage) afterStage->clear();
    for (size_t i = 0; i < cascade_.stages.size(); ++i) {
      int count = 0;
      const float threshold = cascade_.stages[i].threshold;
      ZelStatus s = cascade_.integerWeights
                        ? zeliApplyHaarClassifier_32s32f_C1R(sum_.data(), sumStep_, norm_.data(), 4 * roi.width,
                                                             mask.data(), roi.width, roi, &count, threshold,
                                                             stages32s_[i])
                        : zeliApplyHaarClassifier_32f_C1R(sumF_.data(), sumStep_, norm_.data(), 4 * roi.width,
                                                          mask.data(), roi.width, roi, &count, threshold,
                                                          stages32f_[i]);
      if (s) return false;
      if (afterStage) afterStage->push_back(count);
      if (i == 0 && firstStage) *firstStage = mask;
      if (count == 0) break;
    }
    return true;
  }

  const std::vector<Zel32f>& norm() const { return norm_; }
  const std::vector<Zel32s>& sum() const { return sum_; }
  const std::vector<Zel64f>& sqr() const { return sqr_; }

 private:
  const HaarCascade& cascade_;
  bool ok_ = true;
  std::vector<ZeliHaarClassifier_32s*> stages32s_;
  std::vector<ZeliHaarClassifier_32f*> stages32f_;
  std::vector<Zel32s> sum_;
  std::vector<Zel32f> sumF_;
  std::vector<Zel64f> sqr_;
  std::vector<Zel32f> norm_;
  int sumStep_ = 0;
};

}  // namespace zeltest

#endif  // ZELCV_TESTS_HAAR_DETECTOR_H
