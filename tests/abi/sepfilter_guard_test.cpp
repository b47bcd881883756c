// The separable pipeline on rows that end (or begin) exactly at an
// inaccessible page: no member may read a source element or write a result
// outside what its arguments name, whichever span policy the taps and
// divisor select (single-precision, exact integer pairs, 16-bit sums, fixed
// point, double sums), whatever the kernel size, anchor and border kind.
// A read past a row faults; results are compared with the same call on
// ordinary memory.
#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "abi/sepfilter_members.h"
#include "support/guard_page.h"

namespace {

using namespace zeltest;

template <class M>
class RowPipelineGuard : public ::testing::Test {};
template <class M>
class ColumnPipelineGuard : public ::testing::Test {};
using RowMembers = ::testing::Types<Row16sC1, Row16sC3, Row16uC1, Row16uC3, Row32fC1, Row32fC3, Row8u16sC1,
                                    Row8u16sC3, RowLowC1, RowLowC3>;
using ColumnMembers = ::testing::Types<Col16sC1, Col16sC3, Col16s8sC1, Col16s8sC3, Col16s8uC1, Col16s8uC3,
                                       Col16uC1, Col16uC3, Col32fC1, Col32fC3, ColLowC1, ColLowC3>;
struct MemberName {
  template <class M> static std::string GetName(int) { return M::name; }
};
TYPED_TEST_SUITE(RowPipelineGuard, RowMembers, MemberName);
TYPED_TEST_SUITE(ColumnPipelineGuard, ColumnMembers, MemberName);

constexpr int kMaxWidth = 70;
const int kSizes[] = {1, 2, 3, 4, 5, 7, 9};

// Taps and divisors that lead the integer members to each of their sum
// forms: small taps with divisor 1 (16-bit or exact pair sums), wide taps
// with divisor 2 (exact pairs or single precision), divisor 3 (single
// precision always).
struct Arithmetic {
  TapKind taps;
  int divisor;
};
const Arithmetic kArithmetic[] = {{TapKind::small, 1}, {TapKind::wide, 2}, {TapKind::small, 3}};

TYPED_TEST(RowPipelineGuard, ReadsNothingPastEitherEndOfARow) {
  using M = TypeParam;
  using S = typename M::S;
  using D = typename M::D;
  constexpr int ch = M::channels;
  std::mt19937 rng(4321 + ch);
  S value[3];
  for (S& v : value) v = randomValue<S>(rng, true);
  std::vector<Zel8u> buffer;
  for (int width = 1; width <= kMaxWidth; ++width) {
    for (GuardSide side : {GuardSide::After, GuardSide::Before}) {
      // Up to 8 extra pixels on the guarded side only serve the in-memory
      // border, whose ROI ends (or starts) exactly that many pixels short of
      // the page.
      GuardedImage<S> source(width + 8, 1, ch, side);
      GuardedImage<D> out(width, 1, ch, side);
      ASSERT_TRUE(source.ok() && out.ok());
      for (int i = 0; i < (width + 8) * ch; ++i) source.row(0)[i] = randomValue<S>(rng, true);
      for (int size : kSizes)
        for (int anchor : {0, size / 2, size - 1})
          for (ZeliBorderType border : {zelBorderConstant, zelBorderReplicate, zelBorderInMemory})
            for (const Arithmetic& a : kArithmetic) {
              const std::vector<typename M::Tap> kernel = randomKernel<typename M::Tap>(rng, size, a.taps);
              int bytes = 0;
              ASSERT_EQ(M::bufferSize({width, 1}, size, &bytes), zelStatusOk);
              buffer.assign(size_t(bytes), 0);
              // The ROI: flush with the guarded end of the row, or as far
              // from it as the in-memory border reaches.
              const int reach = border != zelBorderInMemory ? 0 : side == GuardSide::After ? size - 1 - anchor : anchor;
              const int first = side == GuardSide::After ? 8 - reach : reach;
              const S* roi = source.row(0) + first * ch;
              D* rows[1] = {out.row(0)};
              ASSERT_EQ(M::call(roi, int(sizeof(S)) * ch * width, rows, {width, 1}, kernel.data(), size, anchor,
                                border, value, a.divisor, buffer.data()),
                        zelStatusOk);
              // The same call on ordinary memory with room around the row.
              std::vector<S> plain(size_t(width + 16) * ch);
              std::memcpy(plain.data() + (8 - first) * ch, source.row(0), sizeof(S) * (width + 8) * ch);
              std::vector<D> expected(size_t(width) * ch);
              D* expectedRows[1] = {expected.data()};
              ASSERT_EQ(M::call(plain.data() + 8 * ch, int(sizeof(S)) * ch * width, expectedRows, {width, 1},
                                kernel.data(), size, anchor, border, value, a.divisor, buffer.data()),
                        zelStatusOk);
              ASSERT_EQ(std::memcmp(expected.data(), out.row(0), sizeof(D) * width * ch), 0)
                  << "width " << width << " size " << size << " anchor " << anchor << " border " << border;
            }
    }
  }
}

TYPED_TEST(ColumnPipelineGuard, ReadsNothingPastEitherEndOfARow) {
  using M = TypeParam;
  using S = typename M::S;
  using D = typename M::D;
  constexpr int ch = M::channels;
  constexpr int kHeight = 2;
  std::mt19937 rng(8765 + ch);
  std::vector<Zel8u> buffer;
  for (int width = 1; width <= kMaxWidth; ++width)
    for (GuardSide side : {GuardSide::After, GuardSide::Before}) {
      // Every row of the source and of the result touches a guard page.
      GuardedImage<S> rows(width, 9 + kHeight - 1, ch, side, 0, true);
      GuardedImage<D> out(width, kHeight, ch, side, 0, true);
      ASSERT_TRUE(rows.ok() && out.ok());
      std::vector<const S*> pointers;
      for (int y = 0; y < rows.height(); ++y) {
        for (int i = 0; i < width * ch; ++i) rows.row(y)[i] = randomValue<S>(rng, true);
        pointers.push_back(rows.row(y));
      }
      for (int size : kSizes)
        for (const Arithmetic& a : kArithmetic) {
          const std::vector<typename M::Tap> kernel = randomKernel<typename M::Tap>(rng, size, a.taps);
          int bytes = 0;
          ASSERT_EQ(M::bufferSize({width, kHeight}, size, &bytes), zelStatusOk);
          buffer.assign(size_t(bytes), 0);
          ASSERT_EQ(M::call(pointers.data(), out.data(), out.step(), {width, kHeight}, kernel.data(), size,
                            a.divisor, buffer.data()),
                    zelStatusOk)
              << "width " << width << " size " << size;
        }
    }
}

}  // namespace
