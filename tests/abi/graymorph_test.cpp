// Grey-level dilation and erosion through the exported interface: against a
// brute-force maximum (minimum) of pixel plus (minus) structuring value over
// random functions (some of them sums of a row and a column part), anchors,
// ROI sizes, steps, offsets, border forms and in place; flat functions
// against our flat morphology; the state's checks.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <random>

#include "morph_support.h"
#include "support/fault_injection.h"
#include "support/test_image.h"
#include "zelcv.h"

namespace {

using namespace morphtest;
using zeltest::Layout;
using zeltest::TestImage;

int randomIn(std::mt19937& rng, int lo, int hi) { return std::uniform_int_distribution<int>(lo, hi)(rng); }

constexpr int kMargin = 12;  // real pixels around the ROI, for in-memory borders
const int kBorders[] = {1, 6, 0x11, 0x21, 0x41, 0x81, 0x31, 0xC1, 0xF1, 0x51};

// The grey functions of each type: values and the typed exports.
template <typename T> struct Gray;
template <> struct Gray<Zel8u> {
  using Value = Zel32s;
  static constexpr auto getSize = zeliMorphGrayGetSize_8u_C1R;
  static constexpr auto init = zeliMorphGrayInit_8u_C1R;
  static constexpr auto initAlloc = zeliMorphGrayInitAlloc_8u_C1R;
  static constexpr auto release = zeliMorphGrayFree_8u_C1R;
  static constexpr auto dilate = zeliGrayDilateBorder_8u_C1R;
  static constexpr auto erode = zeliGrayErodeBorder_8u_C1R;
  static Value off() { return -255; }
  static Value randomValue(std::mt19937& rng) {
    switch (rng() % 8) {
      case 0: return randomIn(rng, -100000, -255);  // never counts
      case 1: return randomIn(rng, 255, 400);       // saturates
      case 2: return rng() % 2 ? std::numeric_limits<Zel32s>::min() : std::numeric_limits<Zel32s>::max();
      default: return randomIn(rng, -40, 40);
    }
  }
  static void fill(TestImage<Zel8u>& im, std::mt19937& rng) { im.fillRandom(rng, 0, rng() % 4 ? 255 : 3); }
  // A sum of a column part and a row part, v(i, j) = g(i) + h(j): all
  // values <= 0 (paraboloids, cones), all >= 0, or of both signs; sums past
  // -255 or 255 sometimes written as far larger values, which act the same.
  static void makeSum(std::vector<Value>& f, int mw, int mh, std::mt19937& rng) {
    const int sign = randomIn(rng, 0, 2);
    const int reach = rng() % 3 ? 40 : 300;
    std::vector<int> g(static_cast<size_t>(mw)), h(static_cast<size_t>(mh));
    auto part = [&] {
      return sign == 0 ? -randomIn(rng, 0, reach) : sign == 1 ? randomIn(rng, 0, reach) : randomIn(rng, -20, 20);
    };
    for (int& v : g) v = part();
    for (int& v : h) v = part();
    for (int j = 0; j < mh; ++j)
      for (int i = 0; i < mw; ++i) {
        Value v = g[size_t(i)] + h[size_t(j)];
        if (v <= -255 && rng() % 2) v = -100000;
        if (v >= 255 && rng() % 2) v = std::numeric_limits<Value>::max();
        f[size_t(j * mw + i)] = v;
      }
  }
};
template <> struct Gray<Zel32f> {
  using Value = Zel32f;
  static constexpr auto getSize = zeliMorphGrayGetSize_32f_C1R;
  static constexpr auto init = zeliMorphGrayInit_32f_C1R;
  static constexpr auto initAlloc = zeliMorphGrayInitAlloc_32f_C1R;
  static constexpr auto release = zeliMorphGrayFree_32f_C1R;
  static constexpr auto dilate = zeliGrayDilateBorder_32f_C1R;
  static constexpr auto erode = zeliGrayErodeBorder_32f_C1R;
  static Value off() { return -std::numeric_limits<float>::infinity(); }
  static void makeSum(std::vector<Value>& f, int mw, int mh, std::mt19937& rng) {
    std::vector<float> g(static_cast<size_t>(mw)), h(static_cast<size_t>(mh));
    for (float& v : g) v = -std::uniform_real_distribution<float>(0.0f, 30.0f)(rng);
    for (float& v : h) v = -std::uniform_real_distribution<float>(0.0f, 30.0f)(rng);
    for (int j = 0; j < mh; ++j)
      for (int i = 0; i < mw; ++i) f[size_t(j * mw + i)] = g[size_t(i)] + h[size_t(j)];
  }
  static Value randomValue(std::mt19937& rng) {
    switch (rng() % 10) {
      case 0: return off();
      case 1: return std::numeric_limits<float>::quiet_NaN();
      case 2: return rng() % 2 ? 0.0f : -0.0f;
      default: return std::uniform_real_distribution<float>(-50.0f, 50.0f)(rng);
    }
  }
  static void fill(TestImage<Zel32f>& im, std::mt19937& rng) {
    im.fillRandom(rng, -100.0f, 100.0f);
    // Now and then the values that test the rules: NaN, infinities, signed zeros.
    const float odd[] = {std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::infinity(),
                         -std::numeric_limits<float>::infinity(), 0.0f, -0.0f};
    if (rng() % 2)
      for (int n = 0; n < 8; ++n)
        im.at(randomIn(rng, 0, im.width() - 1), randomIn(rng, 0, im.height() - 1)) = odd[rng() % 5];
  }
};

// The source pixel standing for (px, py): in-memory sides read the real
// pixel, the others the nearest ROI pixel.
template <typename T>
T sourceAt(const Source<T>& s, int border, int px, int py) {
  if (!((px < 0 && memLeft(border)) || (px >= s.width && memRight(border)))) px = clampTo(px, s.width);
  if (!((py < 0 && memTop(border)) || (py >= s.height && memBottom(border)))) py = clampTo(py, s.height);
  return s.get(px, py, 0);
}

Zel8u referencePixel8u(bool dilate, const Source<Zel8u>& s, const std::vector<Zel32s>& f, int mw, int mh, int ax,
                       int ay, int border, int x, int y) {
  int64_t best = dilate ? std::numeric_limits<int64_t>::min() : std::numeric_limits<int64_t>::max();
  for (int j = 0; j < mh; ++j)
    for (int i = 0; i < mw; ++i) {
      const int64_t p = sourceAt(s, border, x + i - ax, y + j - ay);
      const int64_t v = f[size_t(j * mw + i)];
      best = dilate ? std::max(best, p + v) : std::min(best, p - v);
    }
  return Zel8u(std::min<int64_t>(255, std::max<int64_t>(0, best)));
}

Zel32f referencePixel32f(bool dilate, const Source<Zel32f>& s, const std::vector<Zel32f>& f, int mw, int mh, int ax,
                         int ay, int border, int x, int y) {
  float best = dilate ? -INFINITY : INFINITY;
  for (int j = 0; j < mh; ++j)
    for (int i = 0; i < mw; ++i) {
      const float p = sourceAt(s, border, x + i - ax, y + j - ay);
      const float t = dilate ? p + f[size_t(j * mw + i)] : p - f[size_t(j * mw + i)];
      if (dilate ? t > best : t < best) best = t;
    }
  return best;
}

Zel8u referencePixel(bool d, const Source<Zel8u>& s, const std::vector<Zel32s>& f, int mw, int mh, int ax, int ay,
                     int b, int x, int y) {
  return referencePixel8u(d, s, f, mw, mh, ax, ay, b, x, y);
}
Zel32f referencePixel(bool d, const Source<Zel32f>& s, const std::vector<Zel32f>& f, int mw, int mh, int ax, int ay,
                      int b, int x, int y) {
  return referencePixel32f(d, s, f, mw, mh, ax, ay, b, x, y);
}

// A state in a caller block at a random offset, with guard bytes after its
// documented size that must survive Init and every call.
struct GuardedBlock {
  std::vector<uint8_t> bytes;
  int offset = 0, size = 0;
  GuardedBlock(std::mt19937& rng, int n) : bytes(size_t(n) + 96, 0x5A), offset(randomIn(rng, 0, 31)), size(n) {}
  ZeliMorphGrayState* state() { return reinterpret_cast<ZeliMorphGrayState*>(bytes.data() + offset); }
  bool intact() const {
    for (size_t i = 0; i < size_t(offset); ++i)
      if (bytes[i] != 0x5A) return false;
    for (size_t i = size_t(offset + size); i < bytes.size(); ++i)
      if (bytes[i] != 0x5A) return false;
    return true;
  }
};

template <typename T>
class GrayMorph : public ::testing::Test {};
using GrayTypes = ::testing::Types<Zel8u, Zel32f>;
TYPED_TEST_SUITE(GrayMorph, GrayTypes);

// Every dilation and erosion against the brute-force reference.
TYPED_TEST(GrayMorph, MatchesBruteForceOverRandomCases) {
  using T = TypeParam;
  using G = Gray<T>;
  std::mt19937 rng(1234);
  for (int iter = 0; iter < 300; ++iter) {
    SCOPED_TRACE(iter);
    const ZeliSize roi = rng() % 5 == 0 ? ZeliSize{randomIn(rng, 60, 200), randomIn(rng, 1, 12)}
                                        : ZeliSize{randomIn(rng, 1, 40), randomIn(rng, 1, 30)};
    const int mw = randomIn(rng, 1, rng() % 6 ? 5 : 11), mh = randomIn(rng, 1, rng() % 6 ? 5 : 11);
    const ZeliPoint anchor = {randomIn(rng, 0, mw - 1), randomIn(rng, 0, mh - 1)};
    std::vector<typename G::Value> f(size_t(mw * mh));
    for (auto& v : f) v = G::randomValue(rng);
    if (rng() % 3 == 0) G::makeSum(f, mw, mh, rng);
    const int border = kBorders[rng() % 10];
    const int maxWidth = roi.width + randomIn(rng, 0, 20);

    int size = 0;
    ASSERT_EQ(G::getSize(maxWidth, {mw, mh}, &size), zelStatusOk);
    GuardedBlock block(rng, size);
    ZeliMorphGrayState* allocated = nullptr;
    const bool useAlloc = rng() % 4 == 0;
    if (useAlloc)
      ASSERT_EQ(G::initAlloc(maxWidth, f.data(), {mw, mh}, anchor, &allocated), zelStatusOk);
    else
      ASSERT_EQ(G::init(maxWidth, f.data(), {mw, mh}, anchor, block.state()), zelStatusOk);
    ZeliMorphGrayState* st = useAlloc ? allocated : block.state();

    Layout outer = zeltest::randomLayout(rng, 1, 1, 1, int(sizeof(T)), int(sizeof(T)));
    outer.width = roi.width + 2 * kMargin;
    outer.height = roi.height + 2 * kMargin;
    TestImage<T> srcImage(outer);
    G::fill(srcImage, rng);
    const Source<T> src{&srcImage, kMargin, roi.width, roi.height, 1};
    for (bool dilate : {true, false}) {
      Layout l = zeltest::randomLayout(rng, 1, 1, 1, int(sizeof(T)), int(sizeof(T)));
      l.width = roi.width;
      l.height = roi.height;
      TestImage<T> dst(l);
      // In place: a second copy of the framed source is both input and output.
      const bool inPlace = rng() % 4 == 0;
      TestImage<T> copy(outer);
      for (int y = 0; y < outer.height; ++y) std::memcpy(copy.row(y), srcImage.row(y), size_t(outer.width) * sizeof(T));
      T* out = inPlace ? &copy.at(kMargin, kMargin) : dst.data();
      const int outStep = inPlace ? copy.step() : dst.step();
      const T* in = inPlace ? out : src.roi();
      const int inStep = inPlace ? copy.step() : src.step();
      auto op = dilate ? G::dilate : G::erode;
      ASSERT_EQ(op(in, inStep, out, outStep, roi, border, st), zelStatusOk);
      for (int y = 0; y < roi.height; ++y)
        for (int x = 0; x < roi.width; ++x) {
          const T want = referencePixel(dilate, src, f, mw, mh, anchor.x, anchor.y, border, x, y);
          const T got = inPlace ? copy.at(x + kMargin, y + kMargin) : dst.at(x, y);
          ASSERT_EQ(std::memcmp(&got, &want, sizeof(T)), 0)
              << (dilate ? "dilation" : "erosion") << " at (" << x << ", " << y << "): got " << double(got)
              << ", want " << double(want) << "; mask " << mw << "x" << mh << " anchor " << anchor.x << ","
              << anchor.y << " border " << border << " roi " << roi.width << "x" << roi.height;
        }
      EXPECT_TRUE(dst.sentinelIntact());
      EXPECT_TRUE(copy.sentinelIntact());
    }
    EXPECT_TRUE(srcImage.sentinelIntact());
    if (useAlloc)
      EXPECT_EQ(G::release(allocated), zelStatusOk);
    else
      EXPECT_TRUE(block.intact());
  }
}

// A function of 0 on a flat mask's elements and off values elsewhere gives
// exactly our flat dilation and erosion.
TYPED_TEST(GrayMorph, FlatFunctionsMatchFlatMorphology) {
  using T = TypeParam;
  using G = Gray<T>;
  std::mt19937 rng(99);
  const Shape shapes[] = {Shape::Rectangle, Shape::Disc, Shape::Cross, Shape::Sparse, Shape::Full, Shape::RowsBand};
  for (int iter = 0; iter < 120; ++iter) {
    SCOPED_TRACE(iter);
    const ZeliSize roi = {randomIn(rng, 1, 70), randomIn(rng, 1, 30)};
    const int mw = randomIn(rng, 1, 9), mh = randomIn(rng, 1, 9);
    Mask mask = makeMask(rng, shapes[rng() % 6], mw, mh);
    bool any = false;
    for (Zel8u m : mask.on) any = any || m;
    if (!any) mask.on[0] = 1;
    std::vector<typename G::Value> f(mask.on.size());
    for (size_t k = 0; k < f.size(); ++k) f[k] = mask.on[k] ? typename G::Value(0) : G::off();
    const ZeliPoint centre = {(mw - 1) / 2, (mh - 1) / 2};
    const int border = kBorders[rng() % 10];

    int graySize = 0, stateSize = 0, bufferSize = 0;
    ASSERT_EQ(G::getSize(roi.width, {mw, mh}, &graySize), zelStatusOk);
    std::vector<uint8_t> grayState(static_cast<size_t>(graySize));
    auto* gst = reinterpret_cast<ZeliMorphGrayState*>(grayState.data());
    ASSERT_EQ(G::init(roi.width, f.data(), {mw, mh}, centre, gst), zelStatusOk);
    std::vector<uint8_t> flatState, buffer;
    ZelStatus s;
    if constexpr (std::is_same<T, Zel8u>::value) {
      s = zeliMorphologyBorderGetSize_8u_C1R(roi.width, {mw, mh}, &stateSize, &bufferSize);
    } else {
      s = zeliMorphologyBorderGetSize_32f_C1R(roi.width, {mw, mh}, &stateSize, &bufferSize);
    }
    ASSERT_EQ(s, zelStatusOk);
    flatState.resize(size_t(stateSize));
    buffer.resize(size_t(bufferSize));
    auto* fst = reinterpret_cast<ZeliMorphState*>(flatState.data());
    if constexpr (std::is_same<T, Zel8u>::value)
      ASSERT_EQ(zeliMorphologyBorderInit_8u_C1R(roi.width, mask.on.data(), {mw, mh}, fst, nullptr), zelStatusOk);
    else
      ASSERT_EQ(zeliMorphologyBorderInit_32f_C1R(roi.width, mask.on.data(), {mw, mh}, fst, nullptr), zelStatusOk);

    TestImage<T> src(Layout{roi.width + 2 * kMargin, roi.height + 2 * kMargin, 1, 0, 0});
    if constexpr (std::is_same<T, Zel8u>::value)
      src.fillRandom(rng, 0, 255);
    else
      src.fillRandom(rng, -100.0f, 100.0f);
    const T* in = &src.at(kMargin, kMargin);
    TestImage<T> gray(Layout{roi.width, roi.height, 1, 0, 0}), flat(Layout{roi.width, roi.height, 1, 0, 0});
    for (bool dilate : {true, false}) {
      ASSERT_EQ((dilate ? G::dilate : G::erode)(in, src.step(), gray.data(), gray.step(), roi, border, gst),
                zelStatusOk);
      if constexpr (std::is_same<T, Zel8u>::value)
        ASSERT_EQ((dilate ? zeliDilateBorder_8u_C1R : zeliErodeBorder_8u_C1R)(
                      in, src.step(), flat.data(), flat.step(), roi, border, 0, fst, buffer.data()),
                  zelStatusOk);
      else
        ASSERT_EQ((dilate ? zeliDilateBorder_32f_C1R : zeliErodeBorder_32f_C1R)(
                      in, src.step(), flat.data(), flat.step(), roi, border, 0.0f, fst, buffer.data()),
                  zelStatusOk);
      EXPECT_TRUE(gray.sameAs(flat)) << (dilate ? "dilation" : "erosion") << " mask " << mw << "x" << mh
                                     << " border " << border;
    }
  }
}

// The checks in order, the state's type and width, and release.
TYPED_TEST(GrayMorph, RefusesBadArgumentsInOrder) {
  using T = TypeParam;
  using G = Gray<T>;
  const typename G::Value f[9] = {};
  int size = 0;
  EXPECT_EQ(G::getSize(10, {3, 3}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(G::getSize(0, {3, 3}, &size), zelStatusBadSize);
  EXPECT_EQ(G::getSize(10, {3, 0}, &size), zelStatusBadSize);
  EXPECT_EQ(G::getSize(INT32_MAX, {3, 3}, &size), zelStatusBadSize);
  EXPECT_EQ(G::getSize(1000, {50000, 50000}, &size), zelStatusBadSize);
  ASSERT_EQ(G::getSize(10, {3, 3}, &size), zelStatusOk);
  std::vector<uint8_t> block(static_cast<size_t>(size));
  auto* st = reinterpret_cast<ZeliMorphGrayState*>(block.data());
  EXPECT_EQ(G::init(10, nullptr, {3, 3}, {1, 1}, st), zelStatusNullPointer);
  EXPECT_EQ(G::init(10, f, {3, 3}, {1, 1}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(G::init(10, f, {0, 3}, {3, 1}, st), zelStatusBadSize);
  EXPECT_EQ(G::init(10, f, {3, 3}, {3, 1}, st), zelStatusBadAnchor);
  EXPECT_EQ(G::init(10, f, {3, 3}, {1, -1}, st), zelStatusBadAnchor);
  EXPECT_EQ(G::initAlloc(10, f, {3, 3}, {1, 1}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(G::release(nullptr), zelStatusNullPointer);
  ASSERT_EQ(G::init(10, f, {3, 3}, {1, 1}, st), zelStatusOk);

  T src[4 * 8] = {}, dst[4 * 8] = {};
  const int step = 8 * int(sizeof(T));
  EXPECT_EQ(G::dilate(nullptr, step, dst, step, {0, 4}, 7, st), zelStatusNullPointer);
  EXPECT_EQ(G::dilate(src, step, dst, step, {8, 4}, 1, nullptr), zelStatusNullPointer);
  EXPECT_EQ(G::dilate(src, step, dst, step, {0, 4}, 7, st), zelStatusBadSize);
  EXPECT_EQ(G::erode(src, step - 1, dst, step, {8, 4}, 7, st), zelStatusBadStep);
  EXPECT_EQ(G::erode(src, step, dst, step - 1, {8, 4}, 7, st), zelStatusBadStep);
  if (sizeof(T) == 4) {
    EXPECT_EQ(G::erode(src, step + 2, dst, step, {8, 3}, 1, st), zelStatusMisalignedStep);
  }
  for (int bad : {0, 2, 3, 4, 5, 7, 0x10, 0xF0})
    EXPECT_EQ(G::dilate(src, step, dst, step, {8, 4}, bad, st), zelStatusBadBorder) << bad;
  EXPECT_EQ(G::dilate(src, 100, dst, 100, {11, 4}, 1, st), zelStatusBadSize);  // wider than the state's 10
  for (const T& v : dst) EXPECT_EQ(v, T(0));

  // A state of the other element type.
  std::vector<uint8_t> other(4096);
  auto* ost = reinterpret_cast<ZeliMorphGrayState*>(other.data());
  if constexpr (std::is_same<T, Zel8u>::value) {
    const Zel32f g[1] = {0};
    ASSERT_EQ(zeliMorphGrayInit_32f_C1R(10, g, {1, 1}, {0, 0}, ost), zelStatusOk);
  } else {
    const Zel32s g[1] = {0};
    ASSERT_EQ(zeliMorphGrayInit_8u_C1R(10, g, {1, 1}, {0, 0}, ost), zelStatusOk);
  }
  EXPECT_EQ(G::dilate(src, step, dst, step, {8, 4}, 1, ost), zelStatusBadDataType);
}

TYPED_TEST(GrayMorph, InitAllocReleasesOnFailure) {
  using G = Gray<TypeParam>;
  const typename G::Value f[6] = {1, 2, 3, 4, 5, 6};
  {
    zeltest::FaultInjection faults;
    faults.failAllocationsFrom(0);
    ZeliMorphGrayState* out = reinterpret_cast<ZeliMorphGrayState*>(&faults);
    EXPECT_EQ(G::initAlloc(30, f, {3, 2}, {2, 1}, &out), zelStatusOutOfMemory);
    EXPECT_EQ(out, reinterpret_cast<ZeliMorphGrayState*>(&faults));
    EXPECT_EQ(faults.liveBlocks(), 0);
  }
  zeltest::FaultInjection faults;
  ZeliMorphGrayState* out = nullptr;
  ASSERT_EQ(G::initAlloc(30, f, {3, 2}, {2, 1}, &out), zelStatusOk);
  EXPECT_EQ(faults.liveBlocks(), 1);
  EXPECT_EQ(G::release(out), zelStatusOk);
  EXPECT_EQ(faults.liveBlocks(), 0);
}

}  // namespace
