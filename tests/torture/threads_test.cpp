// Concurrent calls: several threads run every export of the torture table at
// once on their own images, buffers and states; then threads share one
// read-only source and one state per family while writing their own
// results, which must equal a single-threaded call's. Meant for the
// ThreadSanitizer build, and a plain check everywhere else.
#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <thread>
#include <vector>

#include "torture/engine.h"

namespace zeltorture {
namespace {

constexpr int kThreads = 4;

TEST(Threads, EveryExportFromSeveralThreadsAtOnce) {
  const std::vector<Described>& all = described();
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t)
    threads.emplace_back([&all, &failures, t] {
      for (std::size_t k = 0; k < all.size(); ++k) {
        // Each thread in its own order, so that different exports overlap.
        const Described& d = all[(k * 7 + std::size_t(t) * 61) % all.size()];
        Variant v;
        v.countAllocations = false;
        v.roi = {9 + 4 * t, 5 + t};
        Outcome o = run(*d.entry, d.args, v);
        if (!o.setupError.empty() || o.status != zelStatusOk || !o.guardsIntact) ++failures;
      }
    });
  for (std::thread& th : threads) th.join();
  EXPECT_EQ(failures.load(), 0);
}

// Runs `call(thread)` on kThreads threads at once; each writes its own
// output, which must equal what `call(-1)` wrote alone.
void expectSameFromEveryThread(const std::function<std::vector<uint8_t>(int)>& call) {
  const std::vector<uint8_t> expected = call(-1);
  std::vector<std::vector<uint8_t>> got(kThreads);
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) threads.emplace_back([&, t] { got[size_t(t)] = call(t); });
  for (std::thread& th : threads) th.join();
  for (int t = 0; t < kThreads; ++t) EXPECT_EQ(got[size_t(t)], expected) << "thread " << t;
}

struct Shared {
  static constexpr int W = 67, H = 23;
  std::vector<Zel8u> src8 = std::vector<Zel8u>(W * H);
  std::vector<Zel32f> src32 = std::vector<Zel32f>(W * H);
  Shared() {
    for (int i = 0; i < W * H; ++i) {
      src8[size_t(i)] = Zel8u((i * 37 + i / W * 11) & 0xFF);
      src32[size_t(i)] = float(src8[size_t(i)]);
    }
  }
};

TEST(Threads, SharedSourcesAndStates) {
  const Shared s;
  const int W = Shared::W, H = Shared::H;
  const ZeliSize roi = {W, H};
  Zel8u square[9] = {1, 1, 1, 1, 1, 1, 1, 1, 1};

  // Accumulation and differences from one shared source.
  expectSameFromEveryThread([&](int) {
    std::vector<Zel32f> acc(size_t(W * H), 1.0f);
    EXPECT_EQ(zeliAddWeighted_8u32f_C1IR(s.src8.data(), W, acc.data(), W * 4, roi, 0.25f), zelStatusOk);
    EXPECT_EQ(zeliAddProduct_32f_C1IR(s.src32.data(), W * 4, s.src32.data(), W * 4, acc.data(), W * 4, roi), 0);
    std::vector<Zel8u> diff(size_t(W * H));
    EXPECT_EQ(zeliAbsDiffC_8u_C1R(s.src8.data(), W, diff.data(), W, roi, 100), zelStatusOk);
    std::vector<uint8_t> out(reinterpret_cast<uint8_t*>(acc.data()), reinterpret_cast<uint8_t*>(acc.data() + acc.size()));
    out.insert(out.end(), diff.begin(), diff.end());
    return out;
  });

  // Integrals.
  expectSameFromEveryThread([&](int) {
    std::vector<Zel32s> sum(size_t((W + 1) * (H + 1)));
    std::vector<Zel64f> sqr(sum.size());
    EXPECT_EQ(zeliSqrIntegral_8u32s64f_C1R(s.src8.data(), W, sum.data(), (W + 1) * 4, sqr.data(), (W + 1) * 8, roi,
                                           0, 0.0),
              zelStatusOk);
    return std::vector<uint8_t>(reinterpret_cast<uint8_t*>(sqr.data()),
                                reinterpret_cast<uint8_t*>(sqr.data() + sqr.size()));
  });

  // Separable row pass with a shared kernel; Canny with a shared source.
  const Zel32f kernel[3] = {0.25f, 0.5f, 0.25f};
  int rowBuffer = 0, cannyBuffer = 0;
  ASSERT_EQ(zeliFilterRowBorderPipelineGetBufferSize_32f_C1R(roi, 3, &rowBuffer), zelStatusOk);
  ASSERT_EQ(zeliCannyBorderGetSize(roi, zelFilterSobel, zelMaskSize3x3, zelNormL2, &cannyBuffer), zelStatusOk);
  expectSameFromEveryThread([&](int) {
    std::vector<Zel32f> rows(size_t(W * H));
    std::vector<Zel32f*> rowPointers;
    for (int y = 0; y < H; ++y) rowPointers.push_back(rows.data() + y * W);
    std::vector<Zel8u> buffer(size_t(std::max(rowBuffer, cannyBuffer)));
    EXPECT_EQ(zeliFilterRowBorderPipeline_32f_C1R(s.src32.data(), W * 4, rowPointers.data(), roi, kernel, 3, 1,
                                                  zelBorderReplicate, 0.0f, buffer.data()),
              zelStatusOk);
    std::vector<Zel8u> edges(size_t(W * H));
    EXPECT_EQ(zeliCannyBorder_8u_C1R(s.src8.data(), W, edges.data(), W, roi, zelFilterSobel, zelMaskSize3x3,
                                     zelBorderReplicate, 0, 50.0f, 150.0f, zelNormL2, buffer.data()),
              zelStatusOk);
    std::vector<uint8_t> out(reinterpret_cast<uint8_t*>(rows.data()), reinterpret_cast<uint8_t*>(rows.data() + rows.size()));
    out.insert(out.end(), edges.begin(), edges.end());
    return out;
  });

  // One flat-morphology state and one compound state, shared; each thread
  // passes its own work buffer.
  int stateSize = 0, bufferSize = 0, advState = 0, advBuffer = 0;
  ASSERT_EQ(zeliMorphologyBorderGetSize_8u_C1R(W, {3, 3}, &stateSize, &bufferSize), zelStatusOk);
  std::vector<Zel8u> state(static_cast<size_t>(stateSize));
  auto* morph = reinterpret_cast<ZeliMorphState*>(state.data());
  ASSERT_EQ(zeliMorphologyBorderInit_8u_C1R(W, square, {3, 3}, morph, nullptr), zelStatusOk);
  ASSERT_EQ(zeliMorphAdvGetSize_32f_C1R(roi, {3, 3}, &advState, &advBuffer), zelStatusOk);
  std::vector<Zel8u> adv(static_cast<size_t>(advState)), advInit(static_cast<size_t>(advBuffer));
  auto* compound = reinterpret_cast<ZeliMorphAdvState*>(adv.data());
  ASSERT_EQ(zeliMorphAdvInit_32f_C1R(roi, square, {3, 3}, compound, advInit.data()), zelStatusOk);
  expectSameFromEveryThread([&](int) {
    std::vector<Zel8u> buffer(size_t(std::max(bufferSize, advBuffer)));
    std::vector<Zel8u> dilated(size_t(W * H));
    EXPECT_EQ(zeliDilateBorder_8u_C1R(s.src8.data(), W, dilated.data(), W, roi, zelBorderReplicate, 0, morph,
                                      buffer.data()),
              zelStatusOk);
    std::vector<Zel32f> opened(size_t(W * H)), closed(size_t(W * H));
    EXPECT_EQ(zeliMorphOpenBorder_32f_C1R(s.src32.data(), W * 4, opened.data(), W * 4, roi, zelBorderReplicate, 0.0f,
                                          compound, buffer.data()),
              zelStatusOk);
    EXPECT_EQ(zeliMorphCloseBorder_32f_C1R(s.src32.data(), W * 4, closed.data(), W * 4, roi, zelBorderReplicate,
                                           0.0f, compound, buffer.data()),
              zelStatusOk);
    std::vector<uint8_t> out(dilated.begin(), dilated.end());
    out.insert(out.end(), reinterpret_cast<uint8_t*>(opened.data()), reinterpret_cast<uint8_t*>(opened.data() + opened.size()));
    out.insert(out.end(), reinterpret_cast<uint8_t*>(closed.data()), reinterpret_cast<uint8_t*>(closed.data() + closed.size()));
    return out;
  });

  // Optical flow: two shared pyramids (the source and its copy moved by a
  // row), each thread with its own tracking state, which the call writes.
  Zel8u* first[1] = {const_cast<Zel8u*>(s.src8.data())};
  Zel8u* second[1] = {const_cast<Zel8u*>(s.src8.data()) + W};
  ZeliSize levelSize[1] = {{W, H - 1}};
  Zel64f scale[1] = {1.0};
  int levelStep[1] = {W};
  const ZeliPyramid pyr1 = {first, levelSize, scale, levelStep, nullptr, 0};
  const ZeliPyramid pyr2 = {second, levelSize, scale, levelStep, nullptr, 0};
  expectSameFromEveryThread([&](int) {
    ZeliOptFlowPyrLKState* lk = nullptr;
    EXPECT_EQ(zeliOpticalFlowPyrLKInitAlloc_8u_C1R(&lk, {W, H}, 7, 0), zelStatusOk);
    const ZeliPoint_32f prev[3] = {{20.0f, 10.0f}, {40.5f, 12.0f}, {60.0f, 5.0f}};
    ZeliPoint_32f next[3] = {prev[0], prev[1], prev[2]};
    Zel8s status[3];
    Zel32f error[3];
    EXPECT_EQ(zeliOpticalFlowPyrLK_8u_C1R(&pyr1, &pyr2, prev, next, status, error, 3, 7, 0, 10, 0.01f, lk),
              zelStatusOk);
    zeliOpticalFlowPyrLKFree_8u_C1R(lk);
    std::vector<uint8_t> out(reinterpret_cast<uint8_t*>(next), reinterpret_cast<uint8_t*>(next + 3));
    out.insert(out.end(), reinterpret_cast<uint8_t*>(status), reinterpret_cast<uint8_t*>(status + 3));
    out.insert(out.end(), reinterpret_cast<uint8_t*>(error), reinterpret_cast<uint8_t*>(error + 3));
    return out;
  });
}

}  // namespace
}  // namespace zeltorture
