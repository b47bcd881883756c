// The mixture model against cv::BackgroundSubtractorMOG2 on the same frames
// of a synthetic video whose object masks are known: ours must be at least as
// precise and find at least as much of the objects (shadows off, defaults).
#include <gtest/gtest.h>

#include <cstdio>
#include <opencv2/video/background_segm.hpp>
#include <vector>

#include "abi/background_video.h"
#include "zelcv.h"

namespace {

void compare(int width, int height, int frames, double noise, int components) {
  const bgvideo::Video v = bgvideo::make(width, height, frames, noise, 9);
  const ZeliSize roi{width, height};
  int bytes = 0;
  ASSERT_EQ(zeliFGMMGetBufferSize_8u_C3R(roi, components, &bytes), zelStatusOk);
  std::vector<uint8_t> block(static_cast<size_t>(bytes)), mask(size_t(width) * height);
  auto* st = reinterpret_cast<ZeliFGMMState*>(block.data());
  ASSERT_EQ(zeliFGMMInit_8u_C3R(roi, components, nullptr, st), zelStatusOk);
  cv::Ptr<cv::BackgroundSubtractorMOG2> mog = cv::createBackgroundSubtractorMOG2(500, 16, false);
  mog->setNMixtures(components);
  bgvideo::Score ours, theirs;
  cv::Mat fg;
  for (int t = 0; t < frames; ++t) {
    std::vector<uint8_t> frame = v.frames[size_t(t)];
    ASSERT_EQ(zeliFGMMForeground_8u_C3R(frame.data(), width * 3, mask.data(), width, roi, st), zelStatusOk);
    mog->apply(cv::Mat(height, width, CV_8UC3, frame.data()), fg);
    if (t < frames / 3) continue;
    ours.add(mask, v.truth[size_t(t)]);
    theirs.add(std::vector<uint8_t>(fg.datastart, fg.dataend), v.truth[size_t(t)]);
  }
  std::printf("%dx%d noise %.0f, %d components: ours precision %.4f recall %.4f; OpenCV precision %.4f recall %.4f\n",
              width, height, noise, components, ours.precision(), ours.recall(), theirs.precision(),
              theirs.recall());
  auto f1 = [](const bgvideo::Score& s) { return 2 * s.precision() * s.recall() / (s.precision() + s.recall()); };
  EXPECT_GE(f1(ours), f1(theirs));
  EXPECT_GE(ours.precision(), theirs.precision() - 0.01);
  EXPECT_GE(ours.recall(), theirs.recall() - 0.01);
}

TEST(BackgroundConformity, MixtureMasksAtLeastAsAccurateAsMOG2) {
  compare(160, 120, 150, 4.0, 5);
  compare(128, 96, 120, 8.0, 3);
}

}  // namespace
