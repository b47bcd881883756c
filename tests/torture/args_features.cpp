// Torture table: corner measures, peaks, FAST, Hough lines and line
// suppression. Corner, peak, FAST and suppression buffers depend on the width
// only, so huge heights are not refused; the Hough buffer grows with width
// plus height (roi:L); the probabilistic state was built for the images' ROI,
// and a wider ROI gives -6 (roi:W).
#include "torture/torture.h"

namespace {

zeltorture::Maker fastState() {
  return {[](zeltorture::Arena& a, ZeliSize) -> void* {
            int bytes = 0;
            if (zeliFastNGetSize(&bytes)) return nullptr;
            auto* state = static_cast<ZeliFastNState*>(a.block(size_t(bytes)));
            return zeliFastNInit(3, 9, 20, 1, state) ? nullptr : state;
          },
          nullptr};
}

zeltorture::Maker houghProbState() {
  return {[](zeltorture::Arena& a, ZeliSize roi) -> void* {
            const ZeliPoint_32f delta = {1.0f, 1.0f};
            int bytes = 0;
            if (zeliHoughProbLineGetSize_8u_C1R(roi, delta, &bytes)) return nullptr;
            auto* state = static_cast<ZeliHoughProbState*>(a.block(size_t(bytes)));
            return zeliHoughProbLineInit_8u32f_C1R(roi, delta, 7u, state) ? nullptr : state;
          },
          nullptr};
}

}  // namespace

TORTURE_MAKER(fast_state, fastState());
TORTURE_MAKER(hough_prob, houghProbState());

#define kCorner8u "in1 out1 roi =2 =33 =3 border=1,0,3,4 =0 buf"
#define kCorner32f "in1 out1 roi =2 =33 =3 border=1,0,3,4 =0 buf"
#define kEigen "in1 out6 roi =2 =55 =2 border=1 =0 buf"
#define kHarris "in1 out1 roi =2 =33 =3 =0.04 border=1,2,4 =0 buf"
#define kQuery "roi =33 =3 res"

TORTURE_FAMILY(features) {
  return {
      TORTURE(zeliMinEigenValGetBufferSize_8u32f_C1R, kQuery),
      TORTURE(zeliMinEigenValGetBufferSize_32f_C1R, kQuery),
      TORTURE(zeliMinEigenVal_8u32f_C1R, kCorner8u),
      TORTURE(zeliMinEigenVal_32f_C1R, kCorner32f),
      TORTURE(zeliEigenValsVecsGetBufferSize_8u32f_C1R, kQuery),
      TORTURE(zeliEigenValsVecsGetBufferSize_32f_C1R, kQuery),
      TORTURE(zeliEigenValsVecs_8u32f_C1R, kEigen),
      TORTURE(zeliEigenValsVecs_32f_C1R, kEigen),
      TORTURE(zeliHarrisCornerGetBufferSize, kQuery),
      TORTURE(zeliHarrisCorner_8u32f_C1R, kHarris),
      TORTURE(zeliHarrisCorner_32f_C1R, kHarris),
      TORTURE(zeliFindPeaks3x3GetBufferSize_32f_C1R, "roiw res"),
      TORTURE(zeliFindPeaks3x3GetBufferSize_32s_C1R, "roiw res"),
      TORTURE(zeliFindPeaks3x3_32f_C1R, "in1 roi =1e30 =1 =0 blk =100 res buf"),
      TORTURE(zeliFindPeaks3x3_32s_C1R, "in1 roi =2000000000 =1 =1 blk =100 res buf"),
      TORTURE(zeliFastNGetSize, "res"),
      TORTURE(zeliFastNInit, "=3 =9 =20 =1 blk"),
      TORTURE(zeliFastNGetBufferSize, "roi res"),
      TORTURE(zeliFastN_8u_C1R, "in1 out1 out1 roi state=fast_state buf"),
      TORTURE(zeliFastN2DToVec_8u, "in1 in1 roi blk blk =8192 res"),
      TORTURE(zeliHoughLineGetSize_8u_C1R, "roi pt=1,1 res"),
      TORTURE(zeliHoughLine_8u32f_C1R, "in1 roi:L pt=1,1 =1000000 blk =100 res buf"),
      TORTURE(zeliHoughLine_Region_8u32f_C1R, "in1 roi:L pt=1,1 =1000000 arr=4,-1000,1000,0,3 blk =100 res buf"),
      TORTURE(zeliHoughProbLineGetSize_8u_C1R, "roi pt=1,1 res"),
      TORTURE(zeliHoughProbLineInit_8u32f_C1R, "roi pt=1,1 =7 blk"),
      TORTURE(zeliHoughProbLine_8u32f_C1R, "in1 roi:W =1000000 =10 =2 blk =100 res state=hough_prob"),
      TORTURE(zeliLineSuppressionGetBufferSize, "roi =5 res"),
      TORTURE(zeliLineSuppression_8u_C1R, "in1 mask out1 roi =5 =10 buf"),
  };
}
