// Building, inspecting, re-tilting and releasing Haar classifiers.
#include "detect/haar_classifier.h"

#include <limits.h>
#include <string.h>

#include "core/alloc.h"

namespace zelcv {
namespace haar {

void updateReach(Classifier& c) {
  int64_t width = 0, height = 0;
  int32_t tilted = 0;
  for (int k = 0; k < c.featureCount; ++k) {
    const Feature& f = c.features[k];
    tilted += f.tilted ? 1 : 0;
    for (int r = 0; r < f.rectCount; ++r) {
      int64_t col, row;
      rectReach(c.rects[f.firstRect + r], f.tilted != 0, col, row);
      if (col > width) width = col;
      if (row > height) height = row;
    }
  }
  c.width = int32_t(width);
  c.height = int32_t(height);
  c.tiltedCount = tilted;
}

namespace {

// The feature's rectangles are valid and their reach fits in an int.
bool featureValid(const ZeliRect* rects, int count, bool tilted) {
  for (int r = 0; r < count; ++r) {
    if (!rectValid(rects[r], tilted)) return false;
    int64_t col = int64_t(rects[r].x) + rects[r].width;
    int64_t row = int64_t(rects[r].y) + rects[r].height + (tilted ? rects[r].width : 0);
    if (col > INT_MAX || row > INT_MAX) return false;
  }
  return true;
}

template <typename W>
ZelStatus build(void** out, const ZeliRect* rects, const W* weights, const Zel32f* thresholds,
                const Zel32f* below, const Zel32f* above, const int* rectCounts, int featureCount, bool tilted,
                WeightType type) {
  if (!out || !rects || !weights || !thresholds || !below || !above || !rectCounts) return zelStatusNullPointer;
  if (featureCount < 1) return zelStatusBadSize;
  int64_t rectTotal = 0;
  for (int k = 0; k < featureCount; ++k) {
    if (rectCounts[k] < 1) return zelStatusBadSize;
    rectTotal += rectCounts[k];
    if (rectTotal > INT_MAX) return zelStatusBadSize;
  }
  int64_t first = 0;
  for (int k = 0; k < featureCount; ++k) {
    if (!featureValid(rects + first, rectCounts[k], tilted)) return zelStatusBadSize;
    first += rectCounts[k];
  }
  const int64_t featuresAt = alignSize(int64_t(sizeof(Classifier)), 16);
  const int64_t rectsAt = alignSize(featuresAt + int64_t(sizeof(Feature)) * featureCount, 16);
  const int64_t bytes = rectsAt + int64_t(sizeof(Rect)) * rectTotal;
  if (bytes > INT_MAX) return zelStatusBadSize;
  uint8_t* block = static_cast<uint8_t*>(allocBytes(int(bytes)));
  if (!block) return zelStatusOutOfMemory;

  Classifier* c = reinterpret_cast<Classifier*>(block);
  c->magic = kMagic;
  c->weightType = type;
  c->featureCount = featureCount;
  c->rectTotal = int32_t(rectTotal);
  c->features = reinterpret_cast<Feature*>(block + featuresAt);
  c->rects = reinterpret_cast<Rect*>(block + rectsAt);
  int32_t next = 0;
  for (int k = 0; k < featureCount; ++k) {
    Feature& f = c->features[k];
    f.firstRect = next;
    f.rectCount = rectCounts[k];
    f.tilted = tilted ? 1 : 0;
    f.threshold = thresholds[k];
    f.below = below[k];
    f.above = above[k];
    for (int r = 0; r < f.rectCount; ++r, ++next) {
      Rect& dst = c->rects[next];
      dst.x = rects[next].x;
      dst.y = rects[next].y;
      dst.width = rects[next].width;
      dst.height = rects[next].height;
      memcpy(&dst.weight, &weights[next], sizeof(W));
    }
  }
  updateReach(*c);
  *out = c;
  return zelStatusOk;
}

}  // namespace
}  // namespace haar
}  // namespace zelcv

using zelcv::haar::build;
using zelcv::haar::Classifier;
using zelcv::haar::WeightType;

ZELCV_ENTRY(zeliHaarClassifierInitAlloc_32f)(ZeliHaarClassifier_32f** classifier, const ZeliRect* rects,
                                             const Zel32f* weights, const Zel32f* thresholds,
                                             const Zel32f* valuesBelow, const Zel32f* valuesAbove,
                                             const int* rectCounts, int featureCount) {
  return build(reinterpret_cast<void**>(classifier), rects, weights, thresholds, valuesBelow, valuesAbove,
               rectCounts, featureCount, false, WeightType::F32);
}

ZELCV_ENTRY(zeliTiltedHaarClassifierInitAlloc_32f)(ZeliHaarClassifier_32f** classifier, const ZeliRect* rects,
                                                   const Zel32f* weights, const Zel32f* thresholds,
                                                   const Zel32f* valuesBelow, const Zel32f* valuesAbove,
                                                   const int* rectCounts, int featureCount) {
  return build(reinterpret_cast<void**>(classifier), rects, weights, thresholds, valuesBelow, valuesAbove,
               rectCounts, featureCount, true, WeightType::F32);
}

ZELCV_ENTRY(zeliHaarClassifierInitAlloc_32s)(ZeliHaarClassifier_32s** classifier, const ZeliRect* rects,
                                             const Zel32s* weights, const Zel32f* thresholds,
                                             const Zel32f* valuesBelow, const Zel32f* valuesAbove,
                                             const int* rectCounts, int featureCount) {
  return build(reinterpret_cast<void**>(classifier), rects, weights, thresholds, valuesBelow, valuesAbove,
               rectCounts, featureCount, false, WeightType::S32);
}

ZELCV_ENTRY(zeliTiltedHaarClassifierInitAlloc_32s)(ZeliHaarClassifier_32s** classifier, const ZeliRect* rects,
                                                   const Zel32s* weights, const Zel32f* thresholds,
                                                   const Zel32f* valuesBelow, const Zel32f* valuesAbove,
                                                   const int* rectCounts, int featureCount) {
  return build(reinterpret_cast<void**>(classifier), rects, weights, thresholds, valuesBelow, valuesAbove,
               rectCounts, featureCount, true, WeightType::S32);
}

// Both element types share the layout, so one routine serves each pair.
ZELCV_SHARED_ENTRY(haarClassifierSize)(const void* classifier, ZeliSize* size) {
  if (!classifier || !size) return zelStatusNullPointer;
  const Classifier* c = static_cast<const Classifier*>(classifier);
  size->width = c->width;
  size->height = c->height;
  return zelStatusOk;
}

ZELCV_SHARED_ENTRY(tiltHaarFeatures)(const Zel8u* mask, void* classifier) {
  if (!mask || !classifier) return zelStatusNullPointer;
  Classifier* c = static_cast<Classifier*>(classifier);
  // Validate every feature first, so that a refusal changes nothing.
  for (int k = 0; k < c->featureCount; ++k) {
    if (!mask[k]) continue;
    const zelcv::haar::Feature& f = c->features[k];
    for (int r = 0; r < f.rectCount; ++r) {
      const zelcv::haar::Rect& q = c->rects[f.firstRect + r];
      if (q.x < q.height || int64_t(q.y) + q.width + q.height > INT_MAX) return zelStatusBadSize;
    }
  }
  for (int k = 0; k < c->featureCount; ++k) c->features[k].tilted = mask[k] ? 1 : 0;
  zelcv::haar::updateReach(*c);
  return zelStatusOk;
}
