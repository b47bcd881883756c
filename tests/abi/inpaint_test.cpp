// Inpainting against a reference written from the documented method with a
// plain search for the next pixel (no heap), over random masks, sizes, steps,
// offsets and radii; what a call may change; the state's checks.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <vector>

#include "abi/integral_reference.h"
#include "support/fault_injection.h"
#include "zelcv.h"

namespace {

using zeltest::exactLayout;
using zeltest::TestImage;

struct March {
  std::vector<float> t;
  std::vector<int> rank;
  std::vector<int> order;
};

March referenceMarch(const std::vector<uint8_t>& unknown, int w, int h, float radius) {
  const size_t n = unknown.size();
  const float far = 1e30f, limit = radius + 2.0f;
  std::vector<uint8_t> boundary(n, 0), state(n, 0);  // 0 far, 1 trial, 2 fixed
  March m{std::vector<float>(n, far), std::vector<int>(n, -1), {}};
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      const size_t i = size_t(y) * w + x;
      if (unknown[i]) continue;
      const bool b = (x > 0 && unknown[i - 1]) || (x + 1 < w && unknown[i + 1]) || (y > 0 && unknown[i - w]) ||
                     (y + 1 < h && unknown[i + w]);
      if (b) boundary[i] = 1, state[i] = 1, m.t[i] = 0.0f;
    }
  for (;;) {
    size_t p = n;
    for (size_t i = 0; i < n; ++i)
      if (state[i] == 1 && (p == n || m.t[i] < m.t[p])) p = i;
    if (p == n) break;
    state[p] = 2;
    if (unknown[p]) m.rank[p] = int(m.order.size()), m.order.push_back(int(p));
    const int px = int(p % w), py = int(p / w);
    const int dx[4] = {-1, 0, 1, 0}, dy[4] = {0, -1, 0, 1};
    for (int k = 0; k < 4; ++k) {
      const int qx = px + dx[k], qy = py + dy[k];
      if (qx < 0 || qy < 0 || qx >= w || qy >= h) continue;
      const size_t q = size_t(qy) * w + qx;
      if (state[q] == 2) continue;
      const bool side = unknown[q] != 0;
      auto usable = [&](size_t j) { return state[j] == 2 && ((unknown[j] != 0) == side || boundary[j]); };
      float a = far, b = far;
      if (qx > 0 && usable(q - 1)) a = std::min(a, m.t[q - 1]);
      if (qx + 1 < w && usable(q + 1)) a = std::min(a, m.t[q + 1]);
      if (qy > 0 && usable(q - w)) b = std::min(b, m.t[q - w]);
      if (qy + 1 < h && usable(q + w)) b = std::min(b, m.t[q + w]);
      const float d = a - b;
      const float c = std::fabs(d) < 1.0f ? (a + b + std::sqrt(2.0f - d * d)) * 0.5f : std::min(a, b) + 1.0f;
      if (!side && c > limit) continue;
      if (c < m.t[q]) m.t[q] = c, state[q] = 1;
    }
  }
  for (size_t i = 0; i < n; ++i)
    if (!unknown[i]) m.t[i] = state[i] == 2 ? 0.0f - m.t[i] : -limit;
  return m;
}

// The documented fill on a row-major copy of the image.
std::vector<uint8_t> referenceInpaint(std::vector<uint8_t> img, int w, int h, int ch, const March& m,
                                      float radius) {
  auto diff = [](float minus, bool hm, float here, float plus, bool hp) {
    if (hm && hp) return (plus - minus) * 0.5f;
    if (hp) return plus - here;
    if (hm) return here - minus;
    return 0.0f;
  };
  const int r = int(radius);
  for (int k = 0; k < int(m.order.size()); ++k) {
    const int p = m.order[size_t(k)], x = p % w, y = p / w;
    auto tt = [&](int xx, int yy) { return m.t[size_t(yy) * w + xx]; };
    float gx = diff(x > 0 ? tt(x - 1, y) : 0, x > 0, tt(x, y), x + 1 < w ? tt(x + 1, y) : 0, x + 1 < w);
    float gy = diff(y > 0 ? tt(x, y - 1) : 0, y > 0, tt(x, y), y + 1 < h ? tt(x, y + 1) : 0, y + 1 < h);
    const float len = std::sqrt(gx * gx + gy * gy);
    if (len > 0) gx /= len, gy /= len;
    auto known = [&](int qx, int qy) {
      return qx >= 0 && qy >= 0 && qx < w && qy < h && m.rank[size_t(qy) * w + qx] < k;
    };
    auto I = [&](int qx, int qy, int c) { return float(img[(size_t(qy) * w + qx) * ch + c]); };
    std::vector<float> num(size_t(ch), 0.0f);
    float den = 0.0f;
    for (int ry = -r; ry <= r; ++ry)
      for (int rx = -r; rx <= r; ++rx) {
        const int d2 = rx * rx + ry * ry;
        if (d2 == 0 || float(d2) > radius * radius || !known(x - rx, y - ry)) continue;
        const int qx = x - rx, qy = y - ry;
        float dir = std::fabs(gx * float(rx) + gy * float(ry)) * (1.0f / std::sqrt(float(d2)));
        dir = std::max(dir, 1e-6f);
        const float wgt = dir * (1.0f / float(d2)) / (1.0f + std::fabs(tt(qx, qy) - tt(x, y)));
        const bool l = known(qx - 1, qy), rr = known(qx + 1, qy), u = known(qx, qy - 1), dd = known(qx, qy + 1);
        for (int c = 0; c < ch; ++c) {
          const float here = I(qx, qy, c);
          const float sx = diff(l ? I(qx - 1, qy, c) : 0, l, here, rr ? I(qx + 1, qy, c) : 0, rr);
          const float sy = diff(u ? I(qx, qy - 1, c) : 0, u, here, dd ? I(qx, qy + 1, c) : 0, dd);
          num[size_t(c)] += wgt * (here + sx * float(rx) + sy * float(ry));
        }
        den += wgt;
      }
    for (int c = 0; c < ch; ++c) {
      float v = den > 0 ? num[size_t(c)] / den : 0.0f;
      v = std::min(255.0f, std::max(0.0f, v));
      img[size_t(p) * ch + c] = uint8_t(int(v + 0.5f));
    }
  }
  return img;
}

// Scratches, blobs or scattered pixels.
std::vector<uint8_t> randomMask(std::mt19937& rng, int w, int h) {
  std::vector<uint8_t> m(size_t(w) * h, 0);
  switch (rng() % 3) {
    case 0:
      for (int s = 0; s < 3; ++s) {
        const int y = int(rng() % h), x0 = int(rng() % w), len = int(rng() % w);
        for (int x = x0; x < std::min(w, x0 + len); ++x) m[size_t(y) * w + x] = 1;
        const int x = int(rng() % w), y0 = int(rng() % h);
        for (int yy = y0; yy < std::min(h, y0 + int(rng() % h)); ++yy) m[size_t(yy) * w + x] = 200;
      }
      break;
    case 1: {
      const int cx = int(rng() % w), cy = int(rng() % h), r = 1 + int(rng() % 6);
      for (int y = 0; y < h; ++y)
        for (int x = 0; x < w; ++x) m[size_t(y) * w + x] = (x - cx) * (x - cx) + (y - cy) * (y - cy) <= r * r;
      break;
    }
    default:
      for (auto& v : m) v = rng() % 5 == 0;
  }
  return m;
}

TEST(Inpaint, BothChannelCountsMatchTheReference) {
  std::mt19937 rng(77);
  for (int i = 0; i < 60; ++i) {
    const int w = 1 + int(rng() % 40), h = 1 + int(rng() % 30), ch = rng() % 2 ? 3 : 1;
    const float radius = 1.0f + float(rng() % 12) * 0.5f;
    const std::vector<uint8_t> unknown = randomMask(rng, w, h);
    SCOPED_TRACE(testing::Message() << w << " x " << h << " C" << ch << " radius " << radius);
    TestImage<Zel8u> mask(exactLayout(rng, w, h, 1, rng() % 2 == 0));
    for (int y = 0; y < h; ++y) std::memcpy(mask.row(y), &unknown[size_t(y) * w], size_t(w));
    zeltest::Layout ls = exactLayout(rng, w, h, 1, rng() % 2 == 0), ld = exactLayout(rng, w, h, 1, false);
    ls.channels = ld.channels = ch;
    TestImage<Zel8u> src(ls), dst(ld);
    std::vector<uint8_t> flat(size_t(w) * h * ch);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w * ch; ++x) {
        // A smooth picture plus noise.
        const int v = (x * 5 + y * 3 + int(rng() % 20)) % 256;
        src.row(y)[x] = uint8_t(v);
        flat[size_t(y) * w * ch + x] = uint8_t(v);
      }
    zeltest::fillGarbage(dst, rng);
    ZeliInpaintState* state = nullptr;
    ASSERT_EQ((ch == 1 ? zeliInpaintInitAlloc_8u_C1R : zeliInpaintInitAlloc_8u_C3R)(mask.data(), mask.step(),
                                                                                    {w, h}, radius, &state),
              0);
    ASSERT_EQ((ch == 1 ? zeliInpaint_8u_C1R : zeliInpaint_8u_C3R)(src.data(), src.step(), dst.data(), dst.step(),
                                                                  {w, h}, state),
              0);
    const std::vector<uint8_t> want = referenceInpaint(flat, w, h, ch, referenceMarch(unknown, w, h, radius), radius);
    for (int y = 0; y < h; ++y)
      for (int x = 0; x < w * ch; ++x) ASSERT_EQ(dst.row(y)[x], want[size_t(y) * w * ch + x]) << x << ", " << y;
    // In place: the same pixels, and the known ones never written.
    ASSERT_EQ((ch == 1 ? zeliInpaint_8u_C1R : zeliInpaint_8u_C3R)(src.data(), src.step(), src.data(), src.step(),
                                                                  {w, h}, state),
              0);
    EXPECT_TRUE(src.sameAs(dst));
    EXPECT_TRUE(src.sentinelIntact() && dst.sentinelIntact() && mask.sentinelIntact());
    EXPECT_EQ(zeliInpaintFree_8u_C3R(state), 0);
    if (HasFailure()) return;
  }
}

TEST(Inpaint, PixelsOutsideTheMaskKeepTheirValues) {
  std::mt19937 rng(5);
  const int w = 64, h = 48;
  std::vector<uint8_t> m = randomMask(rng, w, h);
  TestImage<Zel8u> src(exactLayout(rng, w, h, 1, false)), dst(exactLayout(rng, w, h, 1, false));
  src.fillRandom(rng, 0, 255);
  ZeliInpaintState* state = nullptr;
  ASSERT_EQ(zeliInpaintInitAlloc_8u_C1R(m.data(), w, {w, h}, 5.0f, &state), 0);
  ASSERT_EQ(zeliInpaint_8u_C1R(src.data(), src.step(), dst.data(), dst.step(), {w, h}, state), 0);
  int changed = 0;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      if (!m[size_t(y) * w + x])
        ASSERT_EQ(dst.at(x, y), src.at(x, y));
      else
        changed += dst.at(x, y) != src.at(x, y);
  EXPECT_GT(changed, 0);
  zeliInpaintFree_8u_C1R(state);
}

TEST(Inpaint, Checks) {
  Zel8u mask[12] = {0, 1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0}, img[36] = {};
  ZeliInpaintState* state = reinterpret_cast<ZeliInpaintState*>(&img[0]);
  ZeliInpaintState* const sentinel = state;
  EXPECT_EQ(zeliInpaintInitAlloc_8u_C1R(nullptr, 4, {4, 3}, 2, &state), zelStatusNullPointer);
  EXPECT_EQ(zeliInpaintInitAlloc_8u_C1R(mask, 4, {4, 3}, 2, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliInpaintInitAlloc_8u_C1R(mask, 4, {4, 0}, 2, &state), zelStatusBadSize);
  EXPECT_EQ(zeliInpaintInitAlloc_8u_C1R(mask, 3, {4, 3}, 2, &state), zelStatusBadStep);
  EXPECT_EQ(zeliInpaintInitAlloc_8u_C1R(mask, 4, {4, 3}, 0.5f, &state), zelStatusBadArgument);
  EXPECT_EQ(zeliInpaintInitAlloc_8u_C1R(mask, 4, {4, 3}, 64.5f, &state), zelStatusBadArgument);
  EXPECT_EQ(zeliInpaintInitAlloc_8u_C1R(mask, 4, {4, 3}, NAN, &state), zelStatusBadArgument);
  EXPECT_EQ(zeliInpaintInitAlloc_8u_C1R(mask, 1, {1, 1 << 30}, 2, &state), zelStatusBadSize);
  EXPECT_EQ(state, sentinel);
  for (int failing : {0, 1}) {  // the state, then the scratch block (the state must go too)
    zeltest::FaultInjection faults;
    faults.failAllocationsFrom(failing);
    EXPECT_EQ(zeliInpaintInitAlloc_8u_C3R(mask, 4, {4, 3}, 2, &state), zelStatusOutOfMemory);
    EXPECT_EQ(faults.allocations(), failing + 1);
    EXPECT_EQ(faults.liveBlocks(), 0);
  }
  EXPECT_EQ(state, sentinel);
  ASSERT_EQ(zeliInpaintInitAlloc_8u_C3R(mask, 4, {4, 3}, 2, &state), 0);
  EXPECT_EQ(zeliInpaint_8u_C1R(img, 4, img, 4, {4, 3}, state), zelStatusBadChannels);
  EXPECT_EQ(zeliInpaint_8u_C3R(img, 12, img, 12, {4, 2}, state), zelStatusBadSize);
  EXPECT_EQ(zeliInpaint_8u_C3R(img, 11, img, 12, {4, 3}, state), zelStatusBadStep);
  EXPECT_EQ(zeliInpaint_8u_C3R(img, 12, img, 12, {4, 3}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zeliInpaint_8u_C3R(img, 12, img, 12, {4, 3}, reinterpret_cast<ZeliInpaintState*>(mask)),
            zelStatusBadContext);
  EXPECT_EQ(zeliInpaint_8u_C3R(img, 12, img, 12, {4, 3}, state), zelStatusOk);
  EXPECT_EQ(zeliInpaintFree_8u_C1R(state), 0);
  EXPECT_EQ(zeliInpaintFree_8u_C1R(nullptr), zelStatusNullPointer);
}

}  // namespace
