// Size arithmetic of pyramids with a rate in (1, 10]: the up range of a
// dimension, the down size, and the chain of level sizes from a base size.
// Products are formed in single precision and truncated toward zero; results
// are 64-bit so that no size wraps.
#ifndef ZELCV_FILTER_PYRAMID_SIZES_H
#define ZELCV_FILTER_PYRAMID_SIZES_H

#include <stdint.h>

#include "zelcv.h"

namespace zelcv {
namespace pyr {

inline bool rateValid(float rate) { return rate > 1.0f && rate <= 10.0f; }

// Smallest and largest size whose down size is n.
inline int64_t upMax(int64_t n, float rate) {
  const int64_t t = int64_t(float(n) * rate);
  return t > n + 1 ? t : n + 1;
}
inline int64_t upMin(int64_t n, float rate) {
  if (n == 1) return 1;
  const int64_t t = int64_t(float(n - 1) * rate) + 1;
  return t > n + 1 ? t : n + 1;
}

// The size whose up range holds (w, h). The ranges of successive sizes are
// adjacent, so the search ends.
inline ZeliSize downSize(ZeliSize src, float rate) {
  auto start = [rate](int n) {
    const int64_t c = int64_t(float(n) / rate + 0.5f);
    return c > 1 ? c : int64_t(1);
  };
  int64_t cw = start(src.width), ch = start(src.height);
  for (bool changed = true; changed;) {
    changed = false;
    if (src.height < upMin(ch, rate)) {
      --ch;
      changed = true;
    } else if (src.height > upMax(ch, rate)) {
      ++ch;
      changed = true;
    }
    if (src.width < upMin(cw, rate)) {
      --cw;
      changed = true;
    } else if (src.width > upMax(cw, rate)) {
      ++cw;
      changed = true;
    }
  }
  return {int(cw), int(ch)};
}

// Down steps from `base` until both dimensions are below 2, at most `limit`.
inline int64_t levelCount(ZeliSize base, float rate, int64_t limit) {
  int64_t n = 0;
  for (ZeliSize s = base; (s.width >= 2 || s.height >= 2) && n < limit; ++n) s = downSize(s, rate);
  return n;
}

}  // namespace pyr
}  // namespace zelcv

#endif  // ZELCV_FILTER_PYRAMID_SIZES_H
