// Row pass of the separable pipeline: every member against the scalar
// reference over kernel sizes, anchors, widths and border kinds, then the
// argument checks in their order, then the buffer queries.
#include <gtest/gtest.h>

#include <cstring>
#include <map>
#include <string>
#include <random>
#include <vector>

#include "abi/sepfilter_members.h"
#include "support/test_image.h"

namespace {

using namespace zeltest;
using sepref::Arith;
using sepref::DivisorRule;

template <class M>
class RowPipeline : public ::testing::Test {};
using RowMembers = ::testing::Types<Row16sC1, Row16sC3, Row16uC1, Row16uC3, Row32fC1, Row32fC3, Row8u16sC1,
                                    Row8u16sC3, RowLowC1, RowLowC3>;
struct MemberName {
  template <class M> static std::string GetName(int) { return M::name; }
};
TYPED_TEST_SUITE(RowPipeline, RowMembers, MemberName);

constexpr int kMargin = 70;  // real pixels on both sides of the ROI (> largest reach)

// One random image filtered by the member and by the reference; fails the
// test on the first differing element.
template <class M>
void checkRowCase(std::mt19937& rng, int size, int anchor, int width, ZeliBorderType border) {
  using S = typename M::S;
  using D = typename M::D;
  using Tap = typename M::Tap;
  constexpr int ch = M::channels;
  const bool wide = rng() % 2 == 0;
  const TapKind tapKind = TapKind(rng() % 3);
  const int height = 1 + int(rng() % 2);

  Layout sl = randomLayout(rng, 1, 1, ch, sizeof(S), sizeof(S));
  sl.width = width + 2 * kMargin;
  sl.height = height;
  TestImage<S> source(sl);
  for (int y = 0; y < height; ++y)
    for (int i = 0; i < sl.width * ch; ++i) source.row(y)[i] = randomValue<S>(rng, wide);
  Layout dl = randomLayout(rng, 1, 1, ch, sizeof(D), sizeof(D));
  dl.width = width;
  dl.height = height;
  TestImage<D> out(dl);
  std::vector<D*> rows;
  for (int y = 0; y < height; ++y) rows.push_back(out.row(y));
  const std::vector<Tap> kernel = randomKernel<Tap>(rng, size, tapKind);
  const int divisor = randomDivisor<M>(rng);
  S value[3];
  for (S& v : value) v = randomValue<S>(rng, true);

  int bytes = 0;
  ASSERT_EQ(M::bufferSize({width, height}, size, &bytes), zelStatusOk);
  const int offset = int(rng() % 32);  // the buffer may start anywhere
  std::vector<Zel8u> buffer(size_t(bytes) + offset);
  const S* roi = source.row(0) + kMargin * ch;
  ASSERT_EQ(M::call(roi, source.step(), rows.data(), {width, height}, kernel.data(), size, anchor, border, value,
                    divisor, buffer.data() + offset),
            zelStatusOk);
  ASSERT_TRUE(out.sentinelIntact());

  std::vector<S> span(size);
  for (int y = 0; y < height; ++y) {
    const S* row = reinterpret_cast<const S*>(reinterpret_cast<const uint8_t*>(roi) + size_t(y) * source.step());
    for (int x = 0; x < width; ++x)
      for (int c = 0; c < ch; ++c) {
        for (int k = 0; k < size; ++k) {
          int i = x - anchor + k;
          if (i < 0 || i >= width) {
            if (border == zelBorderConstant) {
              span[k] = value[c];
              continue;
            }
            if (border == zelBorderReplicate) i = i < 0 ? 0 : width - 1;
          }
          span[k] = row[i * ch + c];
        }
        const D expected = sepref::combine<D>(M::arith, kernel.data(), span.data(), size, divisor);
        const D got = out.at(x, y, c);
        ASSERT_EQ(std::memcmp(&expected, &got, sizeof(D)), 0)
            << "size " << size << " anchor " << anchor << " width " << width << " border " << border << " x " << x
            << " y " << y << " c " << c << ": expected " << double(expected) << " got " << double(got);
        // The reference itself stays within one unit of the exact quotient.
        const double exact = sepref::exactValue(kernel.data(), span.data(), size,
                                                       M::rule == DivisorRule::none ? 1 : divisor);
        if (M::arith == Arith::floatTrunc && tapKind == TapKind::small && exact > double(std::numeric_limits<D>::lowest()) + 1 &&
            exact < double(std::numeric_limits<D>::max()) - 1) {
          ASSERT_LE(std::abs(double(expected) - std::trunc(exact)), 1.0);
        }
        if (M::arith == Arith::rowDouble) {
          ASSERT_NEAR(double(expected), exact, 1e-4 * (1 + std::abs(exact)));
        }
      }
  }
}

TYPED_TEST(RowPipeline, MatchesReferenceForEverySizeAnchorWidthAndBorder) {
  std::mt19937 rng(1234 + TypeParam::channels);
  for (int size = 1; size <= 9; ++size)
    for (int anchor = 0; anchor < size; ++anchor)
      for (int width = 1; width <= 40; ++width)
        for (ZeliBorderType border : {zelBorderConstant, zelBorderReplicate, zelBorderInMemory}) {
          checkRowCase<TypeParam>(rng, size, anchor, width, border);
          if (::testing::Test::HasFatalFailure()) return;
        }
}

// Rows long enough for several vector blocks of either width and a partial
// last block, at every anchor.
TYPED_TEST(RowPipeline, MatchesReferenceOnWideRows) {
  std::mt19937 rng(777 + TypeParam::channels);
  for (int size = 1; size <= 9; ++size)
    for (int anchor = 0; anchor < size; ++anchor)
      for (ZeliBorderType border : {zelBorderConstant, zelBorderReplicate, zelBorderInMemory}) {
        checkRowCase<TypeParam>(rng, size, anchor, 41 + int(rng() % 220), border);
        if (::testing::Test::HasFatalFailure()) return;
      }
  // Kernels longer than the runs that float rows are widened into.
  for (int size : {22, 23, 66, 67})
    for (ZeliBorderType border : {zelBorderConstant, zelBorderReplicate, zelBorderInMemory}) {
      checkRowCase<TypeParam>(rng, size, int(rng() % size), 1 + int(rng() % 300), border);
      if (::testing::Test::HasFatalFailure()) return;
    }
}

// A valid call that the check tests break one argument at a time.
template <class M>
struct RowCall {
  using S = typename M::S;
  using D = typename M::D;
  static constexpr int ch = M::channels;
  static constexpr int width = 8, height = 2;
  std::vector<S> source = std::vector<S>(size_t(width + 4) * ch * height);
  std::vector<D> out = std::vector<D>(size_t(width) * ch * height, D(77));
  std::vector<D*> rows = {out.data(), out.data() + width * ch};
  std::vector<typename M::Tap> kernel = std::vector<typename M::Tap>(5, typename M::Tap(1));
  std::vector<Zel8u> buffer = std::vector<Zel8u>(4096);
  S value[3] = {};
  const S* src = source.data() + 2 * ch;
  int srcStep = int((width + 4) * ch * sizeof(S));
  D** dst = rows.data();
  ZeliSize roi = {width, height};
  const typename M::Tap* taps = kernel.data();
  int size = 3, anchor = 1;
  ZeliBorderType border = zelBorderReplicate;
  const S* valuePtr = value;
  int divisor = 1;
  Zel8u* buf = buffer.data();

  ZelStatus run() {
    return M::call(src, srcStep, dst, roi, taps, size, anchor, border, valuePtr, divisor, buf);
  }
  bool untouched() const {
    for (D v : out)
      if (v != D(77)) return false;
    return true;
  }
};

TYPED_TEST(RowPipeline, ChecksInTheirOrder) {
  using M = TypeParam;
  using Call = RowCall<M>;
  constexpr int elementSize = int(sizeof(typename M::S));
  auto expect = [](ZelStatus want, auto&& change, const char* what) { expectStatus<Call>(want, change, what); };
  expect(zelStatusNullPointer, [](Call& c) { c.src = nullptr; c.roi.width = 0; }, "null src before size");
  expect(zelStatusNullPointer, [](Call& c) { c.dst = nullptr; }, "null dst");
  expect(zelStatusNullPointer, [](Call& c) { c.taps = nullptr; }, "null kernel");
  expect(zelStatusNullPointer, [](Call& c) { c.buf = nullptr; c.size = 0; }, "null buffer");
  expect(zelStatusBadSize, [](Call& c) { c.roi.height = 0; c.rows[0] = nullptr; }, "height 0 before rows");
  expect(zelStatusBadSize, [](Call& c) { c.roi.width = -1; }, "negative width");
  // Row pointers are tested before the kernel size and the anchor.
  expect(zelStatusNullPointer, [](Call& c) { c.rows[1] = nullptr; c.size = 0; }, "null last row");
  if (M::channels == 3) {
    expect(zelStatusNullPointer, [](Call& c) { c.valuePtr = nullptr; c.size = 0; }, "null value, replicate");
  } else {
    expect(zelStatusOk, [](Call& c) { c.valuePtr = nullptr; }, "value by value");
  }
  expect(zelStatusBadSize, [](Call& c) { c.size = 0; c.anchor = 5; }, "size 0 before anchor");
  expect(zelStatusBadAnchor, [](Call& c) { c.anchor = -1; c.srcStep = 1; }, "anchor before step");
  expect(zelStatusBadAnchor, [](Call& c) { c.anchor = 3; }, "anchor == size");
  expect(zelStatusBadStep, [](Call& c) { c.srcStep = Call::width * Call::ch * int(sizeof(typename M::S)) - 1; c.border = 2; },
         "step below row bytes before border");
  expect(zelStatusBadStep, [](Call& c) { c.srcStep = 0; }, "zero step");
  // Step alignment: an element-size multiple is required of 16- and 32-bit data only.
  expect(elementSize == 1 ? zelStatusOk : zelStatusMisalignedStep,
         [](Call& c) { c.srcStep = Call::width * Call::ch * int(sizeof(typename M::S)) + 1; }, "odd step");
  if (elementSize == 4)
    expect(zelStatusMisalignedStep, [](Call& c) { c.srcStep = Call::width * Call::ch * 4 + 2; c.border = 3; },
           "step of 32f not a multiple of 4, before border");
  for (ZeliBorderType bad : {2, 3, 4, 5, 7, 15, 0x10, 0x11, 1 | 0x40, 6 | 0x80, 0xF6, -1})
    expect(zelStatusBadArgument, [bad](Call& c) { c.border = bad; c.divisor = 0; }, "border");
  for (ZeliBorderType good : {0, 1, 6}) expect(zelStatusOk, [good](Call& c) { c.border = good; }, "accepted border");
  const bool zeroRefused = M::rule == DivisorRule::nonZero || M::rule == DivisorRule::positive;
  expect(zeroRefused ? zelStatusBadArgument : zelStatusOk, [](Call& c) { c.divisor = 0; }, "divisor 0");
  const bool negativeRefused = M::rule == DivisorRule::positive;
  expect(negativeRefused ? zelStatusBadArgument : zelStatusOk, [](Call& c) { c.divisor = -3; }, "divisor -3");
}

TYPED_TEST(RowPipeline, BufferQueryFormulaAndChecks) {
  using M = TypeParam;
  const std::map<std::string, std::pair<int, int>> formula = {
      {"16s_C1R", {48, 112}},  {"16s_C3R", {40, 96}},       {"16u_C1R", {48, 80}},      {"16u_C3R", {112, 80}},
      {"32f_C1R", {64, 96}},   {"32f_C3R", {192, 64}},      {"8u16s_C1R", {36, 144}},   {"8u16s_C3R", {60, 144}},
      {"Low_16s_C1R", {24, 96}}, {"Low_16s_C3R", {208, 96}}};
  const auto f = formula.at(M::name);
  std::mt19937 rng(5);
  for (int i = 0; i < 200; ++i) {
    const int size = 1 + int(rng() % 300);
    const ZeliSize roi = {1 + int(rng() % 5000), 1 + int(rng() % 5000)};
    int bytes = -1;
    ASSERT_EQ(M::bufferSize(roi, size, &bytes), zelStatusOk);
    ASSERT_EQ(bytes, f.first * size + f.second) << "size " << size;  // independent of the ROI
  }
  int bytes = -1;
  EXPECT_EQ(M::bufferSize({0, 0}, 0, nullptr), zelStatusNullPointer);
  EXPECT_EQ(M::bufferSize({0, 5}, 3, &bytes), zelStatusBadSize);
  EXPECT_EQ(M::bufferSize({5, 0}, 3, &bytes), zelStatusBadSize);
  EXPECT_EQ(M::bufferSize({5, 5}, 0, &bytes), zelStatusBadSize);
  EXPECT_EQ(M::bufferSize({5, 5}, 1 << 30, &bytes), zelStatusBadSize);  // would not fit an int
  EXPECT_EQ(bytes, -1);
}

// Conversions named by the contract, checked on values worked out by hand.
TEST(RowPipelineConversion, TruncatesTowardZeroAndSaturates) {
  const Zel16s kernel[1] = {1};
  Zel16s src[4] = {-17, 17, 32767, -32768};
  Zel16s out[4] = {};
  Zel16s* rows[1] = {out};
  std::vector<Zel8u> buffer(256);
  ASSERT_EQ(zeliFilterRowBorderPipeline_16s_C1R(src, 8, rows, {4, 1}, kernel, 1, 0, zelBorderReplicate, 0, 10,
                                                buffer.data()),
            zelStatusOk);
  EXPECT_EQ(out[0], -1);  // -1.7
  EXPECT_EQ(out[1], 1);   // 1.7
  const Zel16s three[3] = {1, 1, 1};
  for (int i : {2, 3}) {  // one pixel, replicated: 3 x 32767 and 3 x -32768 saturate
    ASSERT_EQ(zeliFilterRowBorderPipeline_16s_C1R(src + i, 2, rows, {1, 1}, three, 3, 1, zelBorderReplicate, 0, 1,
                                                  buffer.data()),
              zelStatusOk);
    EXPECT_EQ(out[0], src[i]);
  }
  // The fixed-point member applies 1/3 as 5461/16384 and floors the result.
  Zel16s low[1] = {3000};
  ASSERT_EQ(zeliFilterRowBorderPipeline_Low_16s_C1R(low, 2, rows, {1, 1}, kernel, 1, 0, zelBorderReplicate, 0, 3,
                                                    buffer.data()),
            zelStatusOk);
  EXPECT_EQ(out[0], (3000 * 5461) >> 14);  // 999, not 1000
  low[0] = -3000;
  ASSERT_EQ(zeliFilterRowBorderPipeline_Low_16s_C1R(low, 2, rows, {1, 1}, kernel, 1, 0, zelBorderReplicate, 0, 3,
                                                    buffer.data()),
            zelStatusOk);
  EXPECT_EQ(out[0], -1000);  // floor(-999.9)
}

// The one-channel 8u member takes a zero divisor: the taps become infinite
// (or NaN for a zero tap) and the clamp sends them to the ends of the range.
TEST(RowPipelineConversion, EightBitOneChannelTakesAZeroDivisor) {
  const Zel16s kernel[1] = {2};
  const Zel8u src[2] = {0, 9};
  Zel16s out[2] = {};
  Zel16s* rows[1] = {out};
  std::vector<Zel8u> buffer(256);
  ASSERT_EQ(zeliFilterRowBorderPipeline_8u16s_C1R(src, 2, rows, {2, 1}, kernel, 1, 0, zelBorderReplicate, 0, 0,
                                                  buffer.data()),
            zelStatusOk);
  EXPECT_EQ(out[0], -32768);  // inf x 0 is NaN
  EXPECT_EQ(out[1], 32767);
}

}  // namespace
