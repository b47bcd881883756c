// Size arithmetic for buffer, state and image-extent formulas whose terms
// are caller sizes (widths, heights, mask extents, steps, channel counts).
// Every operation saturates at kSizeCap instead of wrapping: a formula over
// sizes near INT_MAX, or a product of two of them, stays defined on every
// word size, and its result compared with INT_MAX refuses them. Values far
// below the cap are exact, so formulas give the same numbers as plain 64-bit
// arithmetic wherever that does not overflow.
#ifndef ZELCV_CORE_SIZES_H
#define ZELCV_CORE_SIZES_H

#include <stdint.h>

namespace zelcv {

class SizeCalc {
 public:
  // 2^61: the sum of two capped values cannot overflow int64_t.
  static constexpr int64_t kSizeCap = int64_t(1) << 61;

  constexpr SizeCalc(int64_t v = 0) : v_(v > kSizeCap ? kSizeCap : v < -kSizeCap ? -kSizeCap : v) {}  // NOLINT
  constexpr int64_t value() const { return v_; }

  friend constexpr SizeCalc operator+(SizeCalc a, SizeCalc b) { return SizeCalc(a.v_ + b.v_); }
  friend constexpr SizeCalc operator-(SizeCalc a, SizeCalc b) { return SizeCalc(a.v_ - b.v_); }
  friend constexpr SizeCalc operator*(SizeCalc a, SizeCalc b) {
    const int64_t ma = a.v_ < 0 ? -a.v_ : a.v_, mb = b.v_ < 0 ? -b.v_ : b.v_;
    if (ma == 0 || mb == 0) return SizeCalc(0);
    const bool negative = (a.v_ < 0) != (b.v_ < 0);
    if (ma > kSizeCap / mb) return SizeCalc(negative ? -kSizeCap : kSizeCap);
    return SizeCalc(negative ? -(ma * mb) : ma * mb);
  }
  // Division by a positive constant (formulas only divide by those).
  friend constexpr SizeCalc operator/(SizeCalc a, int64_t d) { return SizeCalc(a.v_ / d); }
  friend constexpr bool operator<(SizeCalc a, SizeCalc b) { return a.v_ < b.v_; }
  friend constexpr bool operator>(SizeCalc a, SizeCalc b) { return a.v_ > b.v_; }
  friend constexpr bool operator<=(SizeCalc a, SizeCalc b) { return a.v_ <= b.v_; }
  friend constexpr bool operator>=(SizeCalc a, SizeCalc b) { return a.v_ >= b.v_; }

 private:
  int64_t v_;
};

// Rounds n up to a multiple of `alignment` (a power of two), saturating.
constexpr SizeCalc alignSize(SizeCalc n, int64_t alignment) {
  return SizeCalc((n.value() + alignment - 1) & ~(alignment - 1));
}

constexpr SizeCalc maxSize(SizeCalc a, SizeCalc b) { return a < b ? b : a; }

}  // namespace zelcv

#endif  // ZELCV_CORE_SIZES_H
