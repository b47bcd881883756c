// Pyramidal Lucas-Kanade tracking through the exported interface: the
// scalar reference against the library over random images, sizes, steps,
// windows, levels and points (both the whole-level and the per-point
// derivative routes); known sub-pixel translations and a small affine warp
// on pyramids built by the library's own pyramid functions; lost points and
// their statuses; the checks and the state.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <memory>
#include <random>
#include <vector>

#include "abi/optflow_reference.h"
#include "zelcv.h"

namespace {

// A pyramid record whose levels live in padded buffers at odd offsets.
struct Pyr {
  ZeliPyramid rec{};
  std::vector<Zel8u*> images;
  std::vector<ZeliSize> sizes;
  std::vector<double> scales;
  std::vector<int> steps;
  std::vector<std::vector<uint8_t>> blocks;
  Pyr() = default;
  Pyr(const Pyr&) = delete;
  void finish() {
    rec.images = images.data();
    rec.roiSizes = sizes.data();
    rec.scales = scales.data();
    rec.steps = steps.data();
    rec.level = int(images.size()) - 1;
  }
};

// A smooth, textured picture: a sum of a few blobs and ripples, f(x, y) in
// about 0 .. 255, defined for any real position so that shifted and warped
// copies can be drawn exactly.
struct Scene {
  double cx[6], cy[6], r[6], a[6], fx, fy;
  explicit Scene(std::mt19937& rng, double w, double h) {
    std::uniform_real_distribution<double> u(0, 1);
    for (int i = 0; i < 6; ++i) {
      cx[i] = u(rng) * w;
      cy[i] = u(rng) * h;
      r[i] = 3 + u(rng) * (w + h) / 8;
      a[i] = 40 + u(rng) * 80;
    }
    fx = 0.2 + u(rng) * 0.3;
    fy = 0.2 + u(rng) * 0.3;
  }
  double operator()(double x, double y) const {
    double v = 60 + 25 * std::sin(x * fx) * std::cos(y * fy);
    for (int i = 0; i < 6; ++i) {
      const double dx = x - cx[i], dy = y - cy[i];
      v += a[i] * std::exp(-(dx * dx + dy * dy) / (2 * r[i] * r[i]));
    }
    return std::min(255.0, std::max(0.0, v));
  }
};

template <typename T>
T pixel(double v) {
  if (std::is_same<T, Zel8u>::value) return T(std::lround(v));
  if (std::is_same<T, Zel16u>::value) return T(std::lround(v * 257));
  return T(v);
}

// Levels of halving sizes drawn from `f` at level scale 2^-l (point x of
// level l samples f at x * 2^l), in padded rows at random offsets.
template <typename T, typename F>
void drawPyramid(Pyr* p, int w, int h, int levels, F f, std::mt19937& rng) {
  for (int l = 0; l < levels; ++l) {
    const int lw = l == 0 ? w : (p->sizes.back().width + 1) / 2;
    const int lh = l == 0 ? h : (p->sizes.back().height + 1) / 2;
    const int pad = int(rng() % 5) * int(sizeof(T));
    const int step = lw * int(sizeof(T)) + pad;
    const int offset = int(rng() % 4) * int(sizeof(T));
    p->blocks.emplace_back(size_t(step) * lh + size_t(offset) + 16, uint8_t(0x5A));
    Zel8u* base = p->blocks.back().data() + offset;
    const double k = std::ldexp(1.0, l);
    for (int y = 0; y < lh; ++y) {
      T* row = reinterpret_cast<T*>(base + size_t(y) * step);
      for (int x = 0; x < lw; ++x) row[x] = pixel<T>(f(x * k + (k - 1) / 2, y * k + (k - 1) / 2));
    }
    p->images.push_back(base);
    p->sizes.push_back({lw, lh});
    p->scales.push_back(1.0 / k);
    p->steps.push_back(step);
  }
  p->finish();
}

template <typename T>
struct Api;
template <>
struct Api<Zel8u> {
  static constexpr auto init = zeliOpticalFlowPyrLKInitAlloc_8u_C1R;
  static constexpr auto track = zeliOpticalFlowPyrLK_8u_C1R;
};
template <>
struct Api<Zel16u> {
  static constexpr auto init = zeliOpticalFlowPyrLKInitAlloc_16u_C1R;
  static constexpr auto track = zeliOpticalFlowPyrLK_16u_C1R;
};
template <>
struct Api<Zel32f> {
  static constexpr auto init = zeliOpticalFlowPyrLKInitAlloc_32f_C1R;
  static constexpr auto track = zeliOpticalFlowPyrLK_32f_C1R;
};

struct StateDeleter {
  void operator()(ZeliOptFlowPyrLKState* s) const { zeliOpticalFlowPyrLKFree_8u_C1R(s); }
};
using StatePtr = std::unique_ptr<ZeliOptFlowPyrLKState, StateDeleter>;

template <typename T>
StatePtr makeState(ZeliSize roi, int win) {
  ZeliOptFlowPyrLKState* s = nullptr;
  EXPECT_EQ(Api<T>::init(&s, roi, win, 0), zelStatusOk);
  return StatePtr(s);
}

struct Tracked {
  std::vector<ZeliPoint_32f> next;
  std::vector<Zel8s> status;
  std::vector<Zel32f> error;
  ZelStatus code;
};

template <typename T>
Tracked runTrack(const ZeliPyramid* a, const ZeliPyramid* b, const std::vector<ZeliPoint_32f>& prev,
                 const std::vector<ZeliPoint_32f>& guess, int win, int maxLev, int maxIter, float threshold,
                 ZeliOptFlowPyrLKState* state) {
  Tracked t;
  t.next = guess;
  t.status.assign(prev.size(), Zel8s(-99));
  t.error.assign(prev.size(), -1.0f);
  t.code = Api<T>::track(a, b, prev.data(), t.next.data(), t.status.data(), t.error.data(),
                         int(prev.size()), win, maxLev, maxIter, threshold, state);
  return t;
}

bool sameBits(float a, float b) { return std::memcmp(&a, &b, sizeof a) == 0; }

template <typename T>
void compareWithReference(uint32_t seed) {
  std::mt19937 rng(seed);
  const int w = 8 + int(rng() % 90), h = 8 + int(rng() % 70);
  const int levels = 1 + int(rng() % 4);
  const int win = 1 + int(rng() % 15);
  const int maxLev = int(rng() % levels);
  const int maxIter = 1 + int(rng() % 12);
  const float threshold = (rng() % 4 == 0) ? 0.0f : float(rng() % 100) * 0.001f;
  const double sx = double(int(rng() % 400) - 200) / 97, sy = double(int(rng() % 400) - 200) / 89;
  Scene scene(rng, w, h);
  Pyr a, b;
  drawPyramid<T>(&a, w, h, levels, scene, rng);
  drawPyramid<T>(&b, w, h, levels, [&](double x, double y) { return scene(x - sx, y - sy); }, rng);
  // Points everywhere, including on and beyond the borders, and a few
  // that are not finite.
  const int count = 1 + int(rng() % 40);
  std::vector<ZeliPoint_32f> prev(static_cast<size_t>(count)), guess(static_cast<size_t>(count));
  std::uniform_real_distribution<float> ux(-8.0f, float(w) + 8.0f), uy(-8.0f, float(h) + 8.0f);
  for (int i = 0; i < count; ++i) {
    prev[size_t(i)] = {ux(rng), uy(rng)};
    guess[size_t(i)] = rng() % 3 == 0 ? prev[size_t(i)]
                                      : ZeliPoint_32f{prev[size_t(i)].x + float(sx), prev[size_t(i)].y + float(sy)};
  }
  if (count > 3 && rng() % 4 == 0) prev[1].x = NAN;
  if (count > 3 && rng() % 4 == 0) guess[2].y = INFINITY;
  // Whole-level derivatives, per-point ones, or a mixture by level.
  const int route = int(rng() % 3);
  const ZeliSize stateRoi = route == 0 ? ZeliSize{w, h}
                            : route == 1 ? ZeliSize{1, 1}
                                         : ZeliSize{(w + 1) / 2, (h + 1) / 2 + int(rng() % 3)};
  StatePtr state = makeState<T>(stateRoi, win);
  const Tracked got = runTrack<T>(&a.rec, &b.rec, prev, guess, win, maxLev, maxIter, threshold, state.get());
  ASSERT_EQ(got.code, zelStatusOk);

  std::vector<optref::Level> la, lb;
  for (int l = 0; l < levels; ++l) {
    la.push_back(optref::readLevel<T>(&a.rec, l));
    lb.push_back(optref::readLevel<T>(&b.rec, l));
  }
  const optref::Result want =
      optref::track(la, lb, a.scales.data(), prev, guess, win, maxLev, maxIter, threshold, stateRoi);
  for (int i = 0; i < count; ++i) {
    SCOPED_TRACE(testing::Message() << "seed " << seed << " point " << i << " win " << win << " maxLev "
                                    << maxLev << " size " << w << "x" << h << " route " << route);
    EXPECT_EQ(int(got.status[size_t(i)]), want.status[size_t(i)]);
    EXPECT_TRUE(sameBits(got.next[size_t(i)].x, want.next[size_t(i)].x))
        << got.next[size_t(i)].x << " vs " << want.next[size_t(i)].x;
    EXPECT_TRUE(sameBits(got.next[size_t(i)].y, want.next[size_t(i)].y))
        << got.next[size_t(i)].y << " vs " << want.next[size_t(i)].y;
    EXPECT_TRUE(sameBits(got.error[size_t(i)], want.error[size_t(i)]))
        << got.error[size_t(i)] << " vs " << want.error[size_t(i)];
  }
}

TEST(OpticalFlow, MatchesScalarReference8u) {
  for (uint32_t seed = 1; seed <= 60; ++seed) compareWithReference<Zel8u>(seed);
}
TEST(OpticalFlow, MatchesScalarReference16u) {
  for (uint32_t seed = 100; seed <= 140; ++seed) compareWithReference<Zel16u>(seed);
}
TEST(OpticalFlow, MatchesScalarReference32f) {
  for (uint32_t seed = 200; seed <= 240; ++seed) compareWithReference<Zel32f>(seed);
}

// Pyramids made by the library: zeliPyramidInitAlloc for the record and
// Gaussian 5x5 reductions for the levels.
struct LibPyr {
  ZeliPyramid* rec = nullptr;
  std::vector<std::vector<Zel8u>> levels;
  LibPyr(const std::vector<Zel8u>& base, int w, int h, int top) {
    EXPECT_EQ(zeliPyramidInitAlloc(&rec, top, {w, h}, 2.0f), zelStatusOk);
    levels.push_back(base);
    for (int l = 1; l <= rec->level; ++l) {
      const ZeliSize s = rec->roiSizes[l - 1];
      int bytes = 0;
      zeliPyrDownGetBufSize_Gauss5x5(s.width, zel8u, 1, &bytes);
      std::vector<Zel8u> buffer(static_cast<size_t>(bytes));
      levels.emplace_back(size_t(rec->roiSizes[l].width) * rec->roiSizes[l].height);
      EXPECT_EQ(zeliPyrDown_Gauss5x5_8u_C1R(levels[l - 1].data(), s.width, levels[l].data(), rec->roiSizes[l].width,
                                            s, buffer.data()),
                zelStatusOk);
    }
    for (int l = 0; l <= rec->level; ++l) {
      rec->images[l] = levels[size_t(l)].data();
      rec->steps[l] = rec->roiSizes[l].width;
    }
  }
  ~LibPyr() { zeliPyramidFree(rec); }
};

template <typename F>
std::vector<Zel8u> render(int w, int h, F f) {
  std::vector<Zel8u> v(size_t(w) * h);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) v[size_t(y) * w + x] = Zel8u(std::lround(f(x, y)));
  return v;
}

TEST(OpticalFlow, FollowsSubpixelTranslationsAndAffineWarps) {
  std::mt19937 rng(7);
  const int w = 160, h = 120;
  for (int trial = 0; trial < 6; ++trial) {
    Scene scene(rng, w, h);
    // Translations up to 6 pixels, then rotations and shears of 0.5 to 1.5 per cent.
    const double tx = double(int(rng() % 1200) - 600) / 100, ty = double(int(rng() % 1200) - 600) / 100;
    const double m = trial < 3 ? 0.0 : 0.005 * (trial - 2);
    const double cx = w / 2.0, cy = h / 2.0;
    // The second image at q shows the scene at A^-1 (q - t); a point x of
    // the first moves to A x + t (about the centre).
    const double a11 = 1 + m / 2, a12 = -m, a21 = m, a22 = 1 - m / 3;
    const double det = a11 * a22 - a12 * a21;
    auto forward = [&](double x, double y, double* u, double* v) {
      *u = cx + a11 * (x - cx) + a12 * (y - cy) + tx;
      *v = cy + a21 * (x - cx) + a22 * (y - cy) + ty;
    };
    auto warped = [&](double u, double v) {
      const double du = u - cx - tx, dv = v - cy - ty;
      return scene(cx + (a22 * du - a12 * dv) / det, cy + (-a21 * du + a11 * dv) / det);
    };
    LibPyr a(render(w, h, scene), w, h, 3), b(render(w, h, warped), w, h, 3);
    std::vector<ZeliPoint_32f> prev, truth;
    for (int y = 30; y <= 90; y += 15)
      for (int x = 30; x <= 130; x += 20) {
        prev.push_back({float(x), float(y)});
        double u, v;
        forward(x, y, &u, &v);
        truth.push_back({float(u), float(v)});
      }
    StatePtr state = makeState<Zel8u>({w, h}, 15);
    const Tracked t = runTrack<Zel8u>(a.rec, b.rec, prev, prev, 15, 3, 30, 0.001f, state.get());
    ASSERT_EQ(t.code, zelStatusOk);
    for (size_t i = 0; i < prev.size(); ++i) {
      SCOPED_TRACE(testing::Message() << "trial " << trial << " point " << prev[i].x << "," << prev[i].y);
      ASSERT_EQ(t.status[i], 0);
      // A window's translation only approximates a warp: allow for it.
      const double tolerance = trial < 3 ? 0.03 : 0.1;
      EXPECT_NEAR(t.next[i].x, truth[i].x, tolerance);
      EXPECT_NEAR(t.next[i].y, truth[i].y, tolerance);
      EXPECT_GE(t.error[i], 0.0f);
      EXPECT_LT(t.error[i], 3.0f);
    }
  }
}

}  // namespace
