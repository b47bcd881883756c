// Plain references for the derivative and smoothing filters, written from
// their documented definitions: the border rule for every pixel, then the
// 2-D sums term by term.
#ifndef ZELCV_TESTS_ABI_FILTERS_REFERENCE_H
#define ZELCV_TESTS_ABI_FILTERS_REFERENCE_H

#include <cmath>
#include <cstdint>
#include <vector>

#include "support/test_image.h"
#include "zelcv.h"

namespace filtref {

// A separable term: row taps (along x) and column taps (down y).
struct Term {
  std::vector<double> row, col;
};
using Kernel = std::vector<Term>;

inline std::vector<double> taps(std::initializer_list<double> t) { return t; }

// The index standing for i in a line of n under a reflecting or repeating kind.
inline int resolve(int i, int n, int kind) {
  if (kind == zelBorderReplicate) return i < 0 ? 0 : i >= n ? n - 1 : i;
  if (kind == zelBorderWrap) return ((i % n) + n) % n;
  if (n == 1) return 0;
  while (i < 0 || i >= n) {
    if (kind == zelBorderMirror)
      i = i < 0 ? -i : 2 * (n - 1) - i;
    else
      i = i < 0 ? -i - 1 : 2 * n - 1 - i;
  }
  return i;
}

// The pixel (x, y, c) of an image whose ROI starts at `roi` (a margin of
// real pixels lies around it), as the border type says.
template <typename T>
double pixel(const T* roi, int step, int w, int h, int ch, int x, int y, int c, int border, const T* value) {
  const int kind = border & 0x0F;
  const bool mem = kind == zelBorderInMemory;
  const bool top = mem || (border & zelBorderInMemTop), bottom = mem || (border & zelBorderInMemBottom);
  const bool left = mem || (border & zelBorderInMemLeft), right = mem || (border & zelBorderInMemRight);
  if ((y < 0 && !top) || (y >= h && !bottom)) {
    if (kind == zelBorderConstant) return double(value[c]);
    y = resolve(y, h, kind);
  }
  if ((x < 0 && !left) || (x >= w && !right)) {
    if (kind == zelBorderConstant) return double(value[c]);
    x = resolve(x, w, kind);
  }
  const T* row = reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(roi) + ptrdiff_t(y) * step);
  return double(row[ptrdiff_t(x) * ch + c]);
}

// The exact integer sum of an integer kernel at (x, y).
template <typename T>
int64_t integerSum(const Kernel& k, const T* roi, int step, int w, int h, int x, int y, int border, T value) {
  int64_t sum = 0;
  for (const Term& t : k) {
    const int r = int(t.row.size()) / 2;
    for (size_t i = 0; i < t.col.size(); ++i)
      for (size_t j = 0; j < t.row.size(); ++j)
        sum += int64_t(t.col[i]) * int64_t(t.row[j]) *
               int64_t(pixel(roi, step, w, h, 1, x - r + int(j), y - r + int(i), 0, border, &value));
  }
  return sum;
}

// The floating-point contract at (x, y, c): per term a double row sum
// rounded to float, then the float column sum in tap order; terms added in
// float.
template <typename T>
float floatSum(const Kernel& k, const T* roi, int step, int w, int h, int ch, int x, int y, int c, int border,
               const T* value) {
  float total = 0.0f;
  for (size_t n = 0; n < k.size(); ++n) {
    const Term& t = k[n];
    const int r = int(t.row.size()) / 2;
    float acc = 0.0f;
    for (size_t i = 0; i < t.col.size(); ++i) {
      double rowSum = 0.0;
      for (size_t j = 0; j < t.row.size(); ++j) {
        const double product = double(float(t.row[j])) *
                               pixel(roi, step, w, h, ch, x - r + int(j), y - r + int(i), c, border, value);
        rowSum = j == 0 ? product : rowSum + product;
      }
      const float product = float(t.col[i]) * float(rowSum);
      acc = i == 0 ? product : acc + product;
    }
    total = n == 0 ? acc : total + acc;
  }
  return total;
}

}  // namespace filtref

#endif  // ZELCV_TESTS_ABI_FILTERS_REFERENCE_H
