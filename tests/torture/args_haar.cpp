// Torture table: Haar classifiers. Every classifier here has rectangles at
// (1, 0) of size 1 x 1, so the integrals need two more columns and one more
// row than the windows (two rows once a feature is tilted).
#include "torture/torture.h"

namespace {

const ZeliRect kRects[2] = {{1, 0, 1, 1}, {1, 0, 1, 1}};
const Zel32f kWeights32f[2] = {1.0f, -1.0f};
const Zel32s kWeights32s[2] = {1, -1};
const Zel32f kThresholds[2] = {0.5f, 0.5f};
const Zel32f kBelow[2] = {1.0f, 0.0f};
const Zel32f kAbove[2] = {0.0f, 1.0f};
const int kCounts[2] = {1, 1};
const Zel8u kTiltSecond[2] = {0, 1};

void* make32f(bool mixed) {
  ZeliHaarClassifier_32f* c = nullptr;
  if (zeliHaarClassifierInitAlloc_32f(&c, kRects, kWeights32f, kThresholds, kBelow, kAbove, kCounts, 2))
    return nullptr;
  if (mixed) zeliTiltHaarFeatures_32f(kTiltSecond, c);
  return c;
}

void* make32s(bool mixed) {
  ZeliHaarClassifier_32s* c = nullptr;
  if (zeliHaarClassifierInitAlloc_32s(&c, kRects, kWeights32s, kThresholds, kBelow, kAbove, kCounts, 2))
    return nullptr;
  if (mixed) zeliTiltHaarFeatures_32s(kTiltSecond, c);
  return c;
}

}  // namespace

TORTURE_MAKER(haar32f, [](zeltorture::Arena&, ZeliSize) { return make32f(false); },
              [](void* p) { zeliHaarClassifierFree_32f(static_cast<ZeliHaarClassifier_32f*>(p)); });
TORTURE_MAKER(haar32s, [](zeltorture::Arena&, ZeliSize) { return make32s(false); },
              [](void* p) { zeliHaarClassifierFree_32s(static_cast<ZeliHaarClassifier_32s*>(p)); });
TORTURE_MAKER(haar32fMixed, [](zeltorture::Arena&, ZeliSize) { return make32f(true); },
              [](void* p) { zeliHaarClassifierFree_32f(static_cast<ZeliHaarClassifier_32f*>(p)); });
TORTURE_MAKER(haar32sMixed, [](zeltorture::Arena&, ZeliSize) { return make32s(true); },
              [](void* p) { zeliHaarClassifierFree_32s(static_cast<ZeliHaarClassifier_32s*>(p)); });

#define ARRAYS "arr=8,1 arr=2,1 arr=2,1 arr=2,1 arr=2,1 arr=2,1 =2"

TORTURE_FAMILY(haar) {
  return {
      TORTURE(zeliHaarClassifierInitAlloc_32f, "new=haar32f " ARRAYS),
      TORTURE(zeliHaarClassifierInitAlloc_32s, "new=haar32s " ARRAYS),
      TORTURE(zeliTiltedHaarClassifierInitAlloc_32f, "new=haar32f " ARRAYS),
      TORTURE(zeliTiltedHaarClassifierInitAlloc_32s, "new=haar32s " ARRAYS),
      TORTURE(zeliHaarClassifierFree_32f, "obj=haar32f"),
      TORTURE(zeliHaarClassifierFree_32s, "obj=haar32s"),
      TORTURE(zeliGetHaarClassifierSize_32f, "state=haar32f blk=8"),
      TORTURE(zeliGetHaarClassifierSize_32s, "state=haar32s blk=8"),
      TORTURE(zeliTiltHaarFeatures_32f, "arr=2,1 state=haar32f"),
      TORTURE(zeliTiltHaarFeatures_32s, "arr=2,1 state=haar32s"),
      TORTURE(zeliApplyHaarClassifier_32f_C1R, "in1:w+2:h+1 in1 io1 roi res =0.5 state=haar32f"),
      TORTURE(zeliApplyHaarClassifier_32s32f_C1R, "in1:w+2:h+1 in1 io1 roi res =0.5 state=haar32s"),
      TORTURE(zeliApplyMixedHaarClassifier_32f_C1R,
              "in1:w+2:h+2 in1:w+2:h+2 in1 io1 roi res =0.5 state=haar32fMixed"),
      TORTURE(zeliApplyMixedHaarClassifier_32s32f_C1R,
              "in1:w+2:h+2 in1:w+2:h+2 in1 io1 roi res =0.5 state=haar32sMixed"),
  };
}
