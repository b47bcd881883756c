// Column pass of the separable pipeline: every member against the scalar
// reference over kernel sizes, widths and row-pointer patterns (repeated
// pointers included), then the argument checks in their order, then the
// buffer queries and their alias groups.
#include <gtest/gtest.h>

#include <cstring>
#include <map>
#include <random>
#include <string>
#include <vector>

#include "abi/sepfilter_members.h"
#include "support/test_image.h"

namespace {

using namespace zeltest;
using sepref::Arith;
using sepref::DivisorRule;

template <class M>
class ColumnPipeline : public ::testing::Test {};
using ColumnMembers = ::testing::Types<Col16sC1, Col16sC3, Col16s8sC1, Col16s8sC3, Col16s8uC1, Col16s8uC3, Col16uC1,
                                       Col16uC3, Col32fC1, Col32fC3, ColLowC1, ColLowC3>;
struct MemberName {
  template <class M> static std::string GetName(int) { return M::name; }
};
TYPED_TEST_SUITE(ColumnPipeline, ColumnMembers, MemberName);

enum class Pointers { distinct, randomRepeats, allSame };

template <class M>
void checkColumnCase(std::mt19937& rng, int size, int width, Pointers pattern) {
  using S = typename M::S;
  using D = typename M::D;
  using Tap = typename M::Tap;
  constexpr int ch = M::channels;
  const bool wide = rng() % 2 == 0;
  const TapKind tapKind = TapKind(rng() % 3);
  const int height = 1 + int(rng() % 3);
  const int count = size + height - 1;

  // A pool of rows; the pointers pick from it.
  Layout pl = randomLayout(rng, 1, 1, ch, sizeof(S), sizeof(S));
  pl.width = width;
  pl.height = count;
  TestImage<S> pool(pl);
  for (int y = 0; y < count; ++y)
    for (int i = 0; i < width * ch; ++i) pool.row(y)[i] = randomValue<S>(rng, wide);
  std::vector<const S*> rows(count);
  for (int i = 0; i < count; ++i) {
    int pick = pattern == Pointers::distinct ? i : pattern == Pointers::allSame ? 0 : int(rng() % count);
    rows[i] = pool.row(pick);
  }
  Layout dl = randomLayout(rng, 1, 1, ch, sizeof(D), sizeof(D));
  dl.width = width;
  dl.height = height;
  TestImage<D> out(dl);
  const std::vector<Tap> kernel = randomKernel<Tap>(rng, size, tapKind);
  const int divisor = randomDivisor<M>(rng);

  int bytes = 0;
  ASSERT_EQ(M::bufferSize({width, height}, size, &bytes), zelStatusOk);
  const int offset = int(rng() % 32);
  std::vector<Zel8u> buffer(size_t(bytes) + offset);
  ASSERT_EQ(M::call(rows.data(), out.data(), out.step(), {width, height}, kernel.data(), size, divisor,
                    buffer.data() + offset),
            zelStatusOk);
  ASSERT_TRUE(out.sentinelIntact());
  ASSERT_TRUE(pool.sentinelIntact());

  std::vector<S> span(size);
  for (int y = 0; y < height; ++y)
    for (int i = 0; i < width * ch; ++i) {
      for (int k = 0; k < size; ++k) span[k] = rows[y + k][i];
      const D expected = sepref::combine<D>(M::arith, kernel.data(), span.data(), size, divisor);
      const D got = out.row(y)[i];
      ASSERT_EQ(std::memcmp(&expected, &got, sizeof(D)), 0)
          << "size " << size << " width " << width << " y " << y << " element " << i << ": expected "
          << double(expected) << " got " << double(got);
      const double exact =
          sepref::exactValue(kernel.data(), span.data(), size, M::rule == DivisorRule::none ? 1 : divisor);
      if (M::arith == Arith::floatRound && tapKind == TapKind::small && exact > double(std::numeric_limits<D>::lowest()) &&
          exact < double(std::numeric_limits<D>::max())) {
        ASSERT_LE(std::abs(double(expected) - exact), 0.5 + 1e-3);
      }
    }
}

TYPED_TEST(ColumnPipeline, MatchesReferenceForEverySizeWidthAndPointerPattern) {
  std::mt19937 rng(99 + TypeParam::channels);
  for (int size = 1; size <= 9; ++size)
    for (int width = 1; width <= 40; ++width)
      for (Pointers p : {Pointers::distinct, Pointers::randomRepeats, Pointers::allSame}) {
        checkColumnCase<TypeParam>(rng, size, width, p);
        if (::testing::Test::HasFatalFailure()) return;
      }
}

// Rows long enough for several vector blocks of either width and a partial
// last block.
TYPED_TEST(ColumnPipeline, MatchesReferenceOnWideRows) {
  std::mt19937 rng(555 + TypeParam::channels);
  for (int size = 1; size <= 9; ++size)
    for (int round = 0; round < 4; ++round)
      for (Pointers p : {Pointers::distinct, Pointers::randomRepeats}) {
        checkColumnCase<TypeParam>(rng, size, 41 + int(rng() % 220), p);
        if (::testing::Test::HasFatalFailure()) return;
      }
}

template <class M>
struct ColumnCall {
  using S = typename M::S;
  using D = typename M::D;
  static constexpr int ch = M::channels;
  static constexpr int width = 8, height = 2;
  std::vector<S> source = std::vector<S>(size_t(width) * ch, S(1));
  std::vector<const S*> rows = std::vector<const S*>(8, source.data());
  // Room for a second row after the largest step the checks try (one row
  // plus a few bytes).
  std::vector<D> out = std::vector<D>(size_t(width) * ch * height + 8, D(77));
  std::vector<typename M::Tap> kernel = std::vector<typename M::Tap>(5, typename M::Tap(1));
  std::vector<Zel8u> buffer = std::vector<Zel8u>(4096);
  const S** src = rows.data();
  D* dst = out.data();
  int dstStep = int(width * ch * sizeof(D));
  ZeliSize roi = {width, height};
  const typename M::Tap* taps = kernel.data();
  int size = 3, divisor = 1;
  Zel8u* buf = buffer.data();

  ZelStatus run() { return M::call(src, dst, dstStep, roi, taps, size, divisor, buf); }
  bool untouched() const {
    for (D v : out)
      if (v != D(77)) return false;
    return true;
  }
};

TYPED_TEST(ColumnPipeline, ChecksInTheirOrder) {
  using M = TypeParam;
  using Call = ColumnCall<M>;
  constexpr int elementSize = int(sizeof(typename M::D));
  constexpr int rowBytes = Call::width * Call::ch * elementSize;
  auto expect = [](ZelStatus want, auto&& change, const char* what) { expectStatus<Call>(want, change, what); };
  expect(zelStatusNullPointer, [](Call& c) { c.src = nullptr; c.roi.height = 0; }, "null src before size");
  expect(zelStatusNullPointer, [](Call& c) { c.dst = nullptr; }, "null dst");
  expect(zelStatusNullPointer, [](Call& c) { c.taps = nullptr; }, "null kernel");
  expect(zelStatusBadSize, [](Call& c) { c.roi.width = 0; c.rows[0] = nullptr; }, "width 0 before rows");
  // size + height - 1 pointers are read: the last one counts, the next does not.
  expect(zelStatusNullPointer, [](Call& c) { c.rows[3] = nullptr; c.dstStep = 1; }, "last row before step");
  expect(zelStatusOk, [](Call& c) { c.rows[4] = nullptr; }, "pointer past the last row");
  // Row pointers are tested before the kernel size: size 0 reads height - 1.
  expect(zelStatusNullPointer, [](Call& c) { c.size = 0; c.rows[0] = nullptr; }, "row before size 0");
  expect(zelStatusBadSize, [](Call& c) { c.size = 0; c.rows[1] = nullptr; }, "size 0");
  expect(zelStatusBadSize, [](Call& c) { c.size = -4; c.dstStep = 0; }, "negative size before step");
  expect(zelStatusBadStep, [](Call& c) { c.dstStep = rowBytes - 1; c.buf = nullptr; }, "step before buffer");
  expect(elementSize == 1 ? zelStatusOk : zelStatusMisalignedStep, [](Call& c) { c.dstStep = rowBytes + 1; },
         "odd step");
  if (elementSize == 4)
    expect(zelStatusMisalignedStep, [](Call& c) { c.dstStep = rowBytes + 2; c.buf = nullptr; },
           "32f step not a multiple of 4, before buffer");
  expect(zelStatusNullPointer, [](Call& c) { c.buf = nullptr; c.divisor = 0; }, "null buffer before divisor");
  expect(M::rule == DivisorRule::none ? zelStatusOk : zelStatusBadArgument, [](Call& c) { c.divisor = 0; },
         "divisor 0");
  expect(zelStatusOk, [](Call& c) { c.divisor = -3; }, "negative divisor");
}

TYPED_TEST(ColumnPipeline, BufferQueryFormulaAndChecks) {
  using M = TypeParam;
  // bytes per column, rounding of the width, constant
  struct Formula { int perColumn, align, constant; };
  const std::map<std::string, Formula> formula = {
      {"16s_C1R", {12, 4, 64}},   {"16s8s_C1R", {12, 4, 64}}, {"16s8u_C1R", {12, 4, 64}},
      {"16s_C3R", {36, 4, 64}},   {"16s8s_C3R", {36, 4, 64}}, {"16s8u_C3R", {36, 4, 64}},
      {"16u_C1R", {0, 1, 32}},    {"16u_C3R", {0, 1, 32}},    {"32f_C1R", {0, 1, 32}},
      {"32f_C3R", {0, 1, 32}},    {"Low_16s_C1R", {12, 8, 64}}, {"Low_16s_C3R", {36, 8, 64}}};
  const Formula f = formula.at(M::name);
  std::mt19937 rng(17);
  for (int i = 0; i < 200; ++i) {
    const int width = 1 + int(rng() % 3000), size = 1 + int(rng() % 100);
    int bytes = -1;
    ASSERT_EQ(M::bufferSize({width, 1 + int(rng() % 50)}, size, &bytes), zelStatusOk);
    const int aligned = (width + f.align - 1) / f.align * f.align;
    ASSERT_EQ(bytes, f.perColumn * aligned + f.constant) << "width " << width;
  }
  int bytes = -1;
  EXPECT_EQ(M::bufferSize({-1, -1}, -1, nullptr), zelStatusNullPointer);
  EXPECT_EQ(M::bufferSize({0, 5}, 3, &bytes), zelStatusBadSize);
  EXPECT_EQ(M::bufferSize({5, 0}, 3, &bytes), zelStatusBadSize);
  EXPECT_EQ(M::bufferSize({5, 5}, 0, &bytes), zelStatusBadSize);
  if (f.perColumn) {
    EXPECT_EQ(M::bufferSize({1 << 28, 5}, 3, &bytes), zelStatusBadSize);  // not an int
  }
  EXPECT_EQ(bytes, -1);
}

// Rounding of the column pass, on values worked out by hand: ties go to the
// even neighbour, results saturate to the output type.
TEST(ColumnPipelineConversion, RoundsToNearestEvenAndSaturates) {
  const Zel16s row[6] = {-17, 25, 35, 300, -300, 32767};
  const Zel16s* rows[1] = {row};
  const Zel16s kernel[1] = {1};
  std::vector<Zel8u> buffer(1024);
  Zel16s out16[6];
  ASSERT_EQ(zeliFilterColumnPipeline_16s_C1R(rows, out16, 12, {6, 1}, kernel, 1, 10, buffer.data()), zelStatusOk);
  EXPECT_EQ(out16[0], -2);  // -1.7
  EXPECT_EQ(out16[1], 2);   // 2.5
  EXPECT_EQ(out16[2], 4);   // 3.5
  Zel8u out8[6];
  ASSERT_EQ(zeliFilterColumnPipeline_16s8u_C1R(rows, out8, 6, {6, 1}, kernel, 1, 1, buffer.data()), zelStatusOk);
  EXPECT_EQ(out8[0], 0);
  EXPECT_EQ(out8[3], 255);
  Zel8s out8s[6];
  ASSERT_EQ(zeliFilterColumnPipeline_16s8s_C1R(rows, out8s, 6, {6, 1}, kernel, 1, 1, buffer.data()), zelStatusOk);
  EXPECT_EQ(out8s[3], 127);
  EXPECT_EQ(out8s[4], -128);
  const Zel16s two[2] = {1, 1};
  const Zel16s* same[2] = {row, row};
  ASSERT_EQ(zeliFilterColumnPipeline_Low_16s_C1R(same, out16, 12, {6, 1}, two, 2, 1, buffer.data()), zelStatusOk);
  EXPECT_EQ(out16[5], 32767);
  EXPECT_EQ(out16[3], 600);
}

}  // namespace
