// Accumulation and absolute differences through the exported interface: every
// export of the table against a plain scalar reference, bit for bit, over
// random sizes, row paddings, pointer offsets, masks and store modes; and the
// fixed order of argument checks.
#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <memory>
#include <random>
#include <set>
#include <sstream>
#include <string>
#include <type_traits>
#include <vector>

#include "abi/arith_table.h"
#include "support/exports.h"
#include "support/fault_injection.h"
#include "support/test_image.h"
#include "zelcore.h"

namespace arithtest {
namespace {

using zeltest::Layout;
using zeltest::TestImage;

// ---- The reference ---------------------------------------------------------

template <typename T>
T absDiffReference(T a, T b) {
  if constexpr (std::is_floating_point<T>::value) {
    float d = a - b;
    uint32_t bits;
    std::memcpy(&bits, &d, 4);
    bits &= 0x7FFFFFFFu;
    std::memcpy(&d, &bits, 4);
    return d;
  } else {
    return T(std::abs(int(a) - int(b)));
  }
}

// The constant of AbsDiffC in the element type: integers are clamped.
template <typename T>
T constantOf(double value) {
  if constexpr (std::is_floating_point<T>::value) {
    return T(value);
  } else {
    int v = int(value);
    return v < 0 ? T(0) : v > std::numeric_limits<T>::max() ? std::numeric_limits<T>::max() : T(v);
  }
}

// One written element: `old` is the value before the call (the accumulator).
template <typename Src, typename D>
D referenceElement(const Export& e, D old, Src s1, Src s2, const Args& a) {
  if constexpr (std::is_same<D, float>::value) {
    if (e.accumulates()) {
      float f1 = float(s1), f2 = float(s2);
      switch (e.op) {
        case Op::Add: return old + f1;
        case Op::Square: return old + f1 * f1;
        case Op::Product: return old + f1 * f2;
        case Op::Weighted: return (f1 - old) * a.alpha + old;
        case Op::WeightedTo: return (f1 - f2) * a.alpha + f2;
        default: break;
      }
    }
  }
  if constexpr (std::is_same<D, Src>::value)
    return absDiffReference(s1, e.op == Op::AbsDiffC ? constantOf<Src>(a.value) : s2);
  return old;
}

// ---- Random images ---------------------------------------------------------

template <typename T>
T randomValue(std::mt19937& rng) {
  if constexpr (std::is_floating_point<T>::value) {
    switch (rng() % 32) {
      case 0: return std::numeric_limits<float>::infinity();
      case 1: return -std::numeric_limits<float>::infinity();
      case 2: return -0.0f;
      case 3: return 0.0f;
      case 4: return std::numeric_limits<float>::denorm_min();
      // Products of two of these, or with a small alpha, underflow.
      case 5: return std::uniform_real_distribution<float>(-1e-20f, 1e-20f)(rng);
      default: return std::uniform_real_distribution<float>(-3000.0f, 3000.0f)(rng);
    }
  } else {
    const T special[] = {T(0), T(1), T(-1), std::numeric_limits<T>::min(), std::numeric_limits<T>::max()};
    if (rng() % 8 == 0) return special[rng() % 5];
    return T(std::uniform_int_distribution<long long>(std::numeric_limits<T>::min(),
                                                      std::numeric_limits<T>::max())(rng));
  }
}

// Row padding and start offset in whole elements, so 8-bit images get odd
// steps and any offset, 16-bit ones even, 32-bit ones multiples of 4. Offsets
// span a whole 64-byte line, so that every position relative to the widest
// vector's alignment occurs.
template <typename T>
Layout randomLayout(std::mt19937& rng, int width, int height, int channels) {
  Layout l;
  l.width = width;
  l.height = height;
  l.channels = channels;
  const int size = int(sizeof(T));
  l.padBytes = std::uniform_int_distribution<int>(0, 19 / size)(rng) * size;
  l.offsetBytes = std::uniform_int_distribution<int>(0, 63 / size)(rng) * size;
  return l;
}

template <typename T>
struct Image {
  Layout layout;
  std::unique_ptr<TestImage<T>> pixels;

  explicit Image(const Layout& l) : layout(l), pixels(new TestImage<T>(l)) {}
  Image clone() const {
    Image copy(layout);
    for (int y = 0; y < layout.height; ++y)
      std::memcpy(copy.pixels->row(y), pixels->row(y), sizeof(T) * layout.width * layout.channels);
    return copy;
  }
  int elements() const { return layout.width * layout.channels; }
  T* row(int y) const { return pixels->row(y); }
  void fill(std::mt19937& rng) {
    for (int y = 0; y < layout.height; ++y)
      for (int i = 0; i < elements(); ++i) row(y)[i] = randomValue<T>(rng);
  }
};

// Mask patterns: about half set, none, all, few set, few unset, and runs of
// set and unset pixels (whole vector blocks unselected beside mixed ones).
constexpr int kMaskPatterns = 6;
void fillMask(Image<uint8_t>& mask, std::mt19937& rng, int pattern) {
  bool inRun = rng() % 2 == 0;
  int runLeft = 0;
  for (int y = 0; y < mask.layout.height; ++y)
    for (int x = 0; x < mask.layout.width; ++x) {
      uint8_t set = uint8_t(std::uniform_int_distribution<int>(1, 255)(rng));
      if (runLeft-- == 0) {
        inRun = !inRun;
        runLeft = std::uniform_int_distribution<int>(0, 150)(rng);
      }
      const bool choice[kMaskPatterns] = {rng() % 2 == 0, false, true, rng() % 8 == 0, rng() % 16 != 0, inRun};
      bool on = choice[pattern];
      mask.row(y)[x] = on ? set : 0;
    }
}

// Describes the first element that differs bit-wise, or returns "".
template <typename T>
std::string firstDifference(const Image<T>& expected, const Image<T>& actual) {
  for (int y = 0; y < expected.layout.height; ++y)
    for (int i = 0; i < expected.elements(); ++i)
      if (std::memcmp(&expected.row(y)[i], &actual.row(y)[i], sizeof(T)) != 0) {
        std::ostringstream s;
        s << "element " << i << " of row " << y << ": expected " << +expected.row(y)[i] << ", got "
          << +actual.row(y)[i];
        return s.str();
      }
  return "";
}

// ---- Random comparison against the reference -------------------------------

struct CacheAnswer {
  int status;
  int bytes;
  const char* what;
};

// Ordinary and streaming answers of the cache query; for functions with a
// cache rule also the exact boundary (streaming) and one byte above it.
std::vector<CacheAnswer> cacheAnswers(const Export& e, ZeliSize roi) {
  std::vector<CacheAnswer> answers = {
      {0, INT_MAX, "large cache"}, {0, 0, "zero cache"}, {zelCoreStatusNoCacheInfo, 0, "failed query"}};
  if (e.bytesPerPixel) {
    int touched = e.bytesPerPixel * roi.width * roi.height;
    answers.push_back({0, touched, "cache equal to bytes touched"});
    answers.push_back({0, touched + 1, "cache one above bytes touched"});
  }
  return answers;
}

float randomAlpha(std::mt19937& rng) {
  const float special[] = {0.0f, 1.0f, 2.0f, -1.0f, 0.5f, 1e-30f};
  return rng() % 3 == 0 ? special[rng() % 6] : std::uniform_real_distribution<float>(0.0f, 1.0f)(rng);
}

double randomConstant(std::mt19937& rng) {
  const double special[] = {-5, 300, 0, 255, 65535, 70000, -1, 1.5};
  return rng() % 3 == 0 ? special[rng() % 8] : std::uniform_real_distribution<double>(-400, 70000)(rng);
}

template <typename Src, typename D>
void compareWithReference(const Export& e, uint32_t seed, int trials) {
  std::mt19937 rng(seed);
  const int channels = e.channels;
  for (int trial = 0; trial < trials; ++trial) {
    // Mostly short rows (heads, parts and tails), some of many full-width
    // vector blocks.
    const int maxWidth[4] = {300, 70, 1200, 70};
    const int width = std::uniform_int_distribution<int>(1, maxWidth[trial % 4])(rng);
    const int height = std::uniform_int_distribution<int>(1, trial % 4 == 2 ? 3 : 5)(rng);
    Image<Src> src1(randomLayout<Src>(rng, width, height, channels));
    Image<Src> src2(randomLayout<Src>(rng, width, height, channels));
    Image<uint8_t> mask(randomLayout<uint8_t>(rng, width, height, 1));
    Image<D> before(randomLayout<D>(rng, width, height, channels));
    src1.fill(rng);
    src2.fill(rng);
    fillMask(mask, rng, trial % kMaskPatterns);
    before.fill(rng);  // the accumulator, or junk that a difference overwrites

    Args args;
    args.roi = {width, height};
    args.alpha = randomAlpha(rng);
    args.value = randomConstant(rng);

    Image<D> expected = before.clone();
    for (int y = 0; y < height; ++y)
      for (int i = 0; i < expected.elements(); ++i) {
        if (e.masked && mask.row(y)[i / channels] == 0) continue;
        expected.row(y)[i] = referenceElement<Src, D>(e, before.row(y)[i], src1.row(y)[i], src2.row(y)[i], args);
      }

    const Image<Src> src1Copy = src1.clone(), src2Copy = src2.clone();
    const Image<uint8_t> maskCopy = mask.clone();
    for (const CacheAnswer& answer : cacheAnswers(e, args.roi)) {
      SCOPED_TRACE(::testing::Message() << "trial " << trial << ", " << width << "x" << height << ", "
                                        << answer.what << ", alpha " << args.alpha << ", value " << args.value);
      Image<D> actual = before.clone();
      int slot = 0;
      args.image[slot] = src1.row(0);
      args.step[slot++] = src1.pixels->step();
      if (e.sources() == 2) {
        args.image[slot] = src2.row(0);
        args.step[slot++] = src2.pixels->step();
      }
      if (e.masked) {
        args.image[slot] = mask.row(0);
        args.step[slot++] = mask.pixels->step();
      }
      args.image[slot] = actual.row(0);
      args.step[slot] = actual.pixels->step();

      zeltest::FaultInjection faults;
      faults.setCacheAnswer(answer.status, answer.bytes);
      ASSERT_EQ(e.call(args), zelStatusOk);
      EXPECT_EQ(faults.cacheQueries(), e.bytesPerPixel ? 1 : 0);
      std::string difference = firstDifference(expected, actual);
      ASSERT_EQ(difference, "");
      ASSERT_TRUE(actual.pixels->sentinelIntact());
      ASSERT_TRUE(src1.pixels->sentinelIntact() && src2.pixels->sentinelIntact() && mask.pixels->sentinelIntact());
      ASSERT_TRUE(src1.pixels->sameAs(*src1Copy.pixels) && src2.pixels->sameAs(*src2Copy.pixels) &&
                  mask.pixels->sameAs(*maskCopy.pixels));
    }
  }
}

void compareWithReference(const Export& e, uint32_t seed, int trials) {
  switch (e.type) {
    case Type::U8:
      return e.accumulates() ? compareWithReference<uint8_t, float>(e, seed, trials)
                             : compareWithReference<uint8_t, uint8_t>(e, seed, trials);
    case Type::S8: return compareWithReference<int8_t, float>(e, seed, trials);
    case Type::U16:
      return e.accumulates() ? compareWithReference<uint16_t, float>(e, seed, trials)
                             : compareWithReference<uint16_t, uint16_t>(e, seed, trials);
    case Type::F32: return compareWithReference<float, float>(e, seed, trials);
  }
}

class ArithExport : public ::testing::TestWithParam<Export> {};

TEST_P(ArithExport, MatchesScalarReferenceInEveryLayoutAndStoreMode) {
  const Export& e = GetParam();
  compareWithReference(e, 1234u + uint32_t(std::strlen(e.name)), 60);
}

// ---- Argument checks ---------------------------------------------------------

// Small images with the steps that must pass: 8-bit steps odd, the mask step
// equal to the (odd) width, 16- and 32-bit steps padded by one element.
struct CheckImages {
  static constexpr int kWidth = 5, kHeight = 3;
  std::vector<Slot> slots;
  std::vector<Image<uint8_t>> images;  // rows of bytes
  std::vector<Image<uint8_t>> snapshots;

  explicit CheckImages(const Export& e) : slots(slotsOf(e)) {
    std::mt19937 rng(5);
    for (const Slot& s : slots) {
      Layout l;
      l.width = rowBytes(s);
      l.height = kHeight;
      l.padBytes = s.mask ? 0 : s.elementBytes > 1 ? s.elementBytes : (l.width % 2 == 0 ? 1 : 2);
      l.offsetBytes = s.elementBytes == 1 ? 3 : s.elementBytes;
      images.emplace_back(l);
      images.back().fill(rng);
      snapshots.push_back(images.back().clone());
    }
  }
  int rowBytes(size_t i) const { return rowBytes(slots[i]); }
  static int rowBytes(const Slot& s) { return kWidth * s.channels * s.elementBytes; }
  Args args() const {
    Args a;
    for (size_t i = 0; i < images.size(); ++i) {
      a.image[i] = images[i].row(0);
      a.step[i] = images[i].pixels->step();
    }
    a.roi = {kWidth, kHeight};
    return a;
  }
  bool untouched() const {
    for (size_t i = 0; i < images.size(); ++i)
      if (!images[i].pixels->sameAs(*snapshots[i].pixels) || !images[i].pixels->sentinelIntact()) return false;
    return true;
  }
};

TEST_P(ArithExport, ChecksArgumentsInTheFixedOrder) {
  const Export& e = GetParam();
  CheckImages im(e);
  const size_t n = im.slots.size();
  zeltest::FaultInjection faults;
  faults.setCacheAnswer(0, INT_MAX);
  auto expectFailure = [&](const Args& a, ZelStatus code, const std::string& what) {
    EXPECT_EQ(e.call(a), code) << what;
    EXPECT_TRUE(im.untouched()) << what << ": a failed call wrote";
  };

  for (size_t i = 0; i < n; ++i) {
    std::string slot = "image argument " + std::to_string(i);
    Args a = im.args();
    a.image[i] = nullptr;
    expectFailure(a, zelStatusNullPointer, slot + " null");
    a.roi = {0, 0};
    a.step[(i + 1) % n] = -1;
    expectFailure(a, zelStatusNullPointer, slot + " null before size and step");

    a = im.args();
    a.step[i] = im.rowBytes(i) - 1;
    expectFailure(a, zelStatusBadStep, slot + " step one below its row bytes");
    a.step[i] = 0;
    expectFailure(a, zelStatusBadStep, slot + " zero step");
    a.step[i] = -im.args().step[i];
    expectFailure(a, zelStatusBadStep, slot + " negative step");
    a.roi.width = 0;
    expectFailure(a, zelStatusBadSize, slot + " bad step after bad size");

    if (im.slots[i].elementBytes > 1) {
      for (int extra = 1; extra < im.slots[i].elementBytes; ++extra) {
        a = im.args();
        a.step[i] += extra;
        expectFailure(a, zelStatusMisalignedStep, slot + " step not a multiple of the element size");
      }
      // Every step-size test comes before any alignment test.
      for (size_t j = 0; j < n; ++j) {
        if (j == i) continue;
        a = im.args();
        a.step[i] += 1;
        a.step[j] = im.rowBytes(j) - 1;
        expectFailure(a, zelStatusBadStep, slot + " misaligned, another step too small");
      }
    }
  }
  const ZeliSize badSizes[] = {{0, 3}, {5, 0}, {-1, 3}, {5, -7}, {INT_MIN, INT_MIN}};
  for (ZeliSize size : badSizes) {
    Args a = im.args();
    a.roi = size;
    expectFailure(a, zelStatusBadSize, "bad size");
  }
  EXPECT_EQ(faults.cacheQueries(), 0) << "the cache is queried only after the checks";

  // Odd 8-bit steps and a mask step equal to the width pass; alpha and the
  // constant are never rejected.
  Args a = im.args();
  a.alpha = std::numeric_limits<float>::quiet_NaN();
  a.value = -1e9;
  EXPECT_EQ(e.call(a), zelStatusOk);
}

std::string exportName(const ::testing::TestParamInfo<Export>& info) { return info.param.name; }

INSTANTIATE_TEST_SUITE_P(Arith, ArithExport, ::testing::ValuesIn(exports()), exportName);

// The table covers exactly the exported accumulation and difference names.
TEST(ArithTable, CoversEveryExport) {
  std::set<std::string> listed, tabled;
  for (const auto& entry : zeltest::exportListing()) {
    std::string name = entry.name;
    if (name.rfind("zeliAdd", 0) == 0 || name.rfind("zeliAbsDiff", 0) == 0) listed.insert(name);
  }
  for (const Export& e : exports()) tabled.insert(e.name);
  EXPECT_EQ(listed, tabled);
  EXPECT_EQ(tabled.size(), 39u);
}

}  // namespace
}  // namespace arithtest
