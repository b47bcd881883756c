// The Haar classifier object: one block of library memory holding a header,
// the features and their rectangles. Both element types share the layout;
// only the weights' type differs, recorded in the header.
#ifndef ZELCV_DETECT_HAAR_CLASSIFIER_H
#define ZELCV_DETECT_HAAR_CLASSIFIER_H

#include <stdint.h>

#include "core/status.h"

namespace zelcv {
namespace haar {

enum class WeightType : int32_t { F32 = 1, S32 = 2 };

struct Rect {
  int32_t x, y, width, height;
  union {
    float f;
    int32_t i;
  } weight;
};

struct Feature {
  int32_t firstRect;
  int32_t rectCount;
  int32_t tilted;
  float threshold;
  float below;
  float above;
};

struct Classifier {
  uint32_t magic;
  WeightType weightType;
  int32_t featureCount;
  int32_t rectTotal;
  int32_t width, height;  // reach of the integral reads, from the window's origin
  int32_t tiltedCount;
  Feature* features;
  Rect* rects;
};

constexpr uint32_t kMagic = 0x48414152u;

// The reach of one rectangle: the largest column and row offsets it reads.
inline void rectReach(const Rect& r, bool tilted, int64_t& col, int64_t& row) {
  col = int64_t(r.x) + r.width;
  row = tilted ? int64_t(r.y) + r.width + r.height : int64_t(r.y) + r.height;
}

inline bool rectValid(const ZeliRect& r, bool tilted) {
  if (r.x < 0 || r.y < 0 || r.width < 1 || r.height < 1) return false;
  return !tilted || r.x >= r.height;
}

// Recomputes the size and the tilted count after the flags changed.
void updateReach(Classifier& c);

}  // namespace haar
}  // namespace zelcv

#endif  // ZELCV_DETECT_HAAR_CLASSIFIER_H
