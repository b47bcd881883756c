// Border extension: the one routine that says which pixel stands for a
// position outside a row, for every border kind and in-memory side flag.
// The separable pipeline, the Gaussian filter, Canny and morphology use it.
#ifndef ZELCV_FILTER_BORDER_H
#define ZELCV_FILTER_BORDER_H

#include "zelcv.h"

namespace zelcv {

constexpr int kBorderKindMask = 0x0F;

inline int borderKind(ZeliBorderType border) { return border & kBorderKindMask; }

// Each side is in memory when its flag is set or the kind is zelBorderInMemory.
inline bool inMemoryTop(ZeliBorderType b) { return (b & zelBorderInMemTop) || borderKind(b) == zelBorderInMemory; }
inline bool inMemoryBottom(ZeliBorderType b) { return (b & zelBorderInMemBottom) || borderKind(b) == zelBorderInMemory; }
inline bool inMemoryLeft(ZeliBorderType b) { return (b & zelBorderInMemLeft) || borderKind(b) == zelBorderInMemory; }
inline bool inMemoryRight(ZeliBorderType b) { return (b & zelBorderInMemRight) || borderKind(b) == zelBorderInMemory; }

// The index inside [0, width) that stands for position i (any integer) under
// the replicate, wrap and mirror kinds. Mirror kinds keep reflecting on rows
// shorter than the reach; on a row of width 1 both mirror kinds give 0.
// Other kinds return i unchanged.
inline int borderIndex(int i, int width, int kind) {
  if (i >= 0 && i < width) return i;
  switch (kind) {
    case zelBorderReplicate:
      return i < 0 ? 0 : width - 1;
    case zelBorderWrap: {
      int r = i % width;
      return r < 0 ? r + width : r;
    }
    case zelBorderMirror: {
      if (width == 1) return 0;
      int period = 2 * (width - 1);
      int r = i % period;
      if (r < 0) r += period;
      return r < width ? r : period - r;
    }
    case zelBorderMirrorWithEdge: {
      int period = 2 * width;
      int r = i % period;
      if (r < 0) r += period;
      return r < width ? r : period - 1 - r;
    }
    default:
      return i;
  }
}

// Builds the pixels just outside a row of `width` pixels of `channels`
// interleaved elements: `left` pixels for positions -left .. -1 into leftOut
// and `right` pixels for positions width .. width+right-1 into rightOut
// (either may be null when its count is 0). A side in memory (its flag or
// zelBorderInMemory) copies the real neighbours of the row; zelBorderConstant
// takes `value` (one element per channel); kind 5 and unknown kinds build
// nothing.
template <typename T>
void extendRowBorder(const T* row, int width, int channels, ZeliBorderType border, const T* value,
                     int left, int right, T* leftOut, T* rightOut) {
  const int kind = borderKind(border);
  auto fill = [&](T* out, int first, int count, bool inMemory) {
    for (int p = 0; p < count; ++p) {
      const int pos = first + p;
      for (int c = 0; c < channels; ++c) {
        T v;
        if (inMemory) {
          v = row[pos * channels + c];
        } else if (kind == zelBorderConstant) {
          v = value[c];
        } else if (kind == zelBorderReplicate || kind == zelBorderWrap || kind == zelBorderMirror ||
                   kind == zelBorderMirrorWithEdge) {
          v = row[borderIndex(pos, width, kind) * channels + c];
        } else {
          return;
        }
        out[p * channels + c] = v;
      }
    }
  };
  fill(leftOut, -left, left, inMemoryLeft(border));
  fill(rightOut, width, right, inMemoryRight(border));
}

}  // namespace zelcv

#endif  // ZELCV_FILTER_BORDER_H
