#include "filter/derivative.h"

#include <emmintrin.h>

#include <algorithm>
#include <cstring>

#include "core/alloc.h"
#include "filter/border.h"
#include "kernels/simd.h"

namespace zelcv {

namespace {

using IntVec = simd::Vec<int16_t>;

// The arithmetic the formulas need, on plain integers and on eight 16-bit
// lanes. Every intermediate value fits in 16 bits, so both give the same
// results whatever the order of the additions.
struct ScalarOps {
  using V = int;
  static V add(V a, V b) { return a + b; }
  static V sub(V a, V b) { return a - b; }
  template <int C> static V mul(V v) { return v * C; }
};

struct VectorOps {
  using V = __m128i;
  static V add(V a, V b) { return _mm_add_epi16(a, b); }
  static V sub(V a, V b) { return _mm_sub_epi16(a, b); }
  template <int C> static V mul(V v) {
    if constexpr (C == 1) return v;
    else if constexpr (C == 2) return _mm_add_epi16(v, v);
    else if constexpr (C == 4) return _mm_slli_epi16(v, 2);
    else return _mm_mullo_epi16(v, _mm_set1_epi16(C));
  }
};

// The two one-dimensional kernels of each derivative kind, applied to 2r + 1
// consecutive samples s[0..2r]: `smooth` with the symmetric smoothing taps,
// `differ` with the antisymmetric derivative taps (positive towards s[2r]).
template <DerivativeKernel K, typename Ops> struct Taps;

template <typename Ops> struct Taps<DerivativeKernel::kSobel3x3, Ops> {
  using V = typename Ops::V;
  static constexpr int kRadius = 1;
  static V smooth(const V* s) { return Ops::add(Ops::add(s[0], s[2]), Ops::template mul<2>(s[1])); }
  static V differ(const V* s) { return Ops::sub(s[2], s[0]); }
};

template <typename Ops> struct Taps<DerivativeKernel::kScharr3x3, Ops> {
  using V = typename Ops::V;
  static constexpr int kRadius = 1;
  static V smooth(const V* s) {
    return Ops::add(Ops::template mul<3>(Ops::add(s[0], s[2])), Ops::template mul<10>(s[1]));
  }
  static V differ(const V* s) { return Ops::sub(s[2], s[0]); }
};

template <typename Ops> struct Taps<DerivativeKernel::kSobel5x5, Ops> {
  using V = typename Ops::V;
  static constexpr int kRadius = 2;
  static V smooth(const V* s) {
    V outer = Ops::add(s[0], s[4]);
    V inner = Ops::template mul<4>(Ops::add(s[1], s[3]));
    return Ops::add(Ops::add(outer, inner), Ops::template mul<6>(s[2]));
  }
  static V differ(const V* s) {
    return Ops::add(Ops::sub(s[4], s[0]), Ops::template mul<2>(Ops::sub(s[3], s[1])));
  }
};

// Column pass over image columns [0, width): smooth[x + r] and diff[x + r]
// from the 2r + 1 source rows.
template <DerivativeKernel K>
void columnPass(const Zel8u* const* rows, int width, Zel16s* smooth, Zel16s* diff) {
  using ST = Taps<K, ScalarOps>;
  using VT = Taps<K, VectorOps>;
  constexpr int n = 2 * ST::kRadius + 1;
  constexpr int r = ST::kRadius;
  auto block = [&](int x) {
    __m128i lo[n], hi[n];
    const __m128i zero = _mm_setzero_si128();
    for (int i = 0; i < n; ++i) {
      __m128i v = IntVec::loadu(rows[i] + x);
      lo[i] = _mm_unpacklo_epi8(v, zero);
      hi[i] = _mm_unpackhi_epi8(v, zero);
    }
    IntVec::storeu(smooth + r + x, VT::smooth(lo));
    IntVec::storeu(smooth + r + x + 8, VT::smooth(hi));
    IntVec::storeu(diff + r + x, VT::differ(lo));
    IntVec::storeu(diff + r + x + 8, VT::differ(hi));
  };
  if (width >= 16) {
    // The last block overlaps the one before it; it rewrites equal values.
    for (int x = 0; x < width; x += 16) block(std::min(x, width - 16));
    return;
  }
  for (int x = 0; x < width; ++x) {
    int s[n];
    for (int i = 0; i < n; ++i) s[i] = rows[i][x];
    smooth[r + x] = Zel16s(ST::smooth(s));
    diff[r + x] = Zel16s(ST::differ(s));
  }
}

// Row pass: dx from the column sums, dy from the column differences.
template <DerivativeKernel K>
void rowPass(const Zel16s* smooth, const Zel16s* diff, int width, Zel16s* dx, Zel16s* dy) {
  using ST = Taps<K, ScalarOps>;
  using VT = Taps<K, VectorOps>;
  constexpr int n = 2 * ST::kRadius + 1;
  auto block = [&](int x) {
    __m128i s[n], d[n];
    for (int i = 0; i < n; ++i) {
      s[i] = IntVec::loadu(smooth + x + i);
      d[i] = IntVec::loadu(diff + x + i);
    }
    IntVec::storeu(dx + x, VT::differ(s));
    IntVec::storeu(dy + x, VT::smooth(d));
  };
  if (width >= 8) {
    for (int x = 0; x < width; x += 8) block(std::min(x, width - 8));
    return;
  }
  for (int x = 0; x < width; ++x) {
    int s[n], d[n];
    for (int i = 0; i < n; ++i) {
      s[i] = smooth[x + i];
      d[i] = diff[x + i];
    }
    dx[x] = Zel16s(ST::differ(s));
    dy[x] = Zel16s(ST::smooth(d));
  }
}

// Column sums and differences at the r columns beyond each end of the row,
// from the border pixels of each source row.
template <DerivativeKernel K>
void borderColumns(const Zel8u (*left)[2], const Zel8u (*right)[2], int width, Zel16s* smooth,
                   Zel16s* diff) {
  using ST = Taps<K, ScalarOps>;
  constexpr int n = 2 * ST::kRadius + 1;
  constexpr int r = ST::kRadius;
  for (int j = 0; j < r; ++j) {
    int sl[n], sr[n];
    for (int i = 0; i < n; ++i) {
      sl[i] = left[i][j];
      sr[i] = right[i][j];
    }
    smooth[j] = Zel16s(ST::smooth(sl));
    diff[j] = Zel16s(ST::differ(sl));
    smooth[r + width + j] = Zel16s(ST::smooth(sr));
    diff[r + width + j] = Zel16s(ST::differ(sr));
  }
}

template <DerivativeKernel K>
void derivativeRow(const Zel8u* const* rows, const Zel8u (*left)[2], const Zel8u (*right)[2],
                   int width, Zel16s* smooth, Zel16s* diff, Zel16s* dx, Zel16s* dy) {
  borderColumns<K>(left, right, width, smooth, diff);
  columnPass<K>(rows, width, smooth, diff);
  rowPass<K>(smooth, diff, width, dx, dy);
}

}  // namespace

size_t DerivativeRows::scratchBytes(DerivativeKernel kernel, int width) {
  const size_t columns = size_t(width) + 2 * derivativeRadius(kernel);
  return 1 + 2 * columns * sizeof(Zel16s) + size_t(width);
}

DerivativeRows::DerivativeRows(const Zel8u* src, int srcStep, ZeliSize roi, DerivativeKernel kernel,
                               ZeliBorderType border, Zel8u borderValue, void* scratch)
    : src_(src),
      srcStep_(srcStep),
      roi_(roi),
      kernel_(kernel),
      border_(border),
      borderValue_(borderValue) {
  const size_t columns = size_t(roi.width) + 2 * derivativeRadius(kernel);
  smooth_ = reinterpret_cast<Zel16s*>(alignUp(scratch, sizeof(Zel16s)));
  diff_ = smooth_ + columns;
  constantRow_ = reinterpret_cast<Zel8u*>(diff_ + columns);
  if (borderKind(border) == zelBorderConstant) std::memset(constantRow_, borderValue, size_t(roi.width));
}

const Zel8u* DerivativeRows::sourceRow(int y) const {
  if (y < 0 ? inMemoryTop(border_) : y >= roi_.height ? inMemoryBottom(border_) : true)
    return src_ + ptrdiff_t(y) * srcStep_;
  const int kind = borderKind(border_);
  if (kind == zelBorderConstant) return constantRow_;
  // Kinds without a rule of their own repeat the edge row.
  int index = borderIndex(y, roi_.height, kind);
  index = std::min(std::max(index, 0), roi_.height - 1);
  return src_ + ptrdiff_t(index) * srcStep_;
}

void DerivativeRows::row(int y, Zel16s* dx, Zel16s* dy) const {
  const int r = derivativeRadius(kernel_);
  const Zel8u* rows[5];
  Zel8u left[5][2], right[5][2];
  for (int i = 0; i <= 2 * r; ++i) {
    rows[i] = sourceRow(y - r + i);
    std::memset(left[i], borderValue_, sizeof(left[i]));
    std::memset(right[i], borderValue_, sizeof(right[i]));
    if (rows[i] != constantRow_)
      extendRowBorder(rows[i], roi_.width, 1, border_, &borderValue_, r, r, left[i], right[i]);
  }
  switch (kernel_) {
    case DerivativeKernel::kSobel3x3:
      derivativeRow<DerivativeKernel::kSobel3x3>(rows, left, right, roi_.width, smooth_, diff_, dx, dy);
      break;
    case DerivativeKernel::kScharr3x3:
      derivativeRow<DerivativeKernel::kScharr3x3>(rows, left, right, roi_.width, smooth_, diff_, dx, dy);
      break;
    case DerivativeKernel::kSobel5x5:
      derivativeRow<DerivativeKernel::kSobel5x5>(rows, left, right, roi_.width, smooth_, diff_, dx, dy);
      break;
  }
}

}  // namespace zelcv
