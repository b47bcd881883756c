// Torture table: labelling, speckles, watershed, gradient segmentation,
// boundaries and inpainting. Every buffer-taking operation refuses, like its
// query, ROIs whose buffer would not fit in an int (roi:L); inpainting states
// are built for the images' ROI by InitAlloc and refuse any other ROI.
#include "torture/torture.h"

namespace {

// A mask with a short scratch across the middle row.
void* makeInpaint(zeltorture::Arena& arena, ZeliSize roi, bool colour) {
  Zel8u* mask = static_cast<Zel8u*>(arena.block(size_t(roi.width) * size_t(roi.height)));
  for (int x = roi.width / 4; x < roi.width - roi.width / 4; ++x) mask[size_t(roi.height / 2) * roi.width + x] = 1;
  ZeliInpaintState* s = nullptr;
  const ZelStatus st = colour ? zeliInpaintInitAlloc_8u_C3R(mask, roi.width, roi, 3.0f, &s)
                              : zeliInpaintInitAlloc_8u_C1R(mask, roi.width, roi, 3.0f, &s);
  return st == zelStatusOk ? s : nullptr;
}

void releaseInpaint(void* p) { zeliInpaintFree_8u_C1R(static_cast<ZeliInpaintState*>(p)); }

}  // namespace

TORTURE_MAKER(inpaint_c1, [](zeltorture::Arena& a, ZeliSize roi) { return makeInpaint(a, roi, false); },
              releaseInpaint);
TORTURE_MAKER(inpaint_c3, [](zeltorture::Arena& a, ZeliSize roi) { return makeInpaint(a, roi, true); },
              releaseInpaint);

TORTURE_FAMILY(segmentation) {
  return {
      TORTURE(zeliLabelMarkersGetBufferSize_8u_C1R, "roi res"),
      TORTURE(zeliLabelMarkersGetBufferSize_8u32s_C1R, "roi res"),
      TORTURE(zeliLabelMarkersGetBufferSize_16u_C1R, "roi res"),
      TORTURE(zeliLabelMarkers_8u_C1IR, "io1 roi:L =1 =254 =1 res buf"),
      TORTURE(zeliLabelMarkers_8u32s_C1R, "in1 out1 roi:L =1 =1000 =2 res buf"),
      TORTURE(zeliLabelMarkers_16u_C1IR, "io1 roi:L =3 =65534 =1 res buf"),
      TORTURE(zeliMarkSpecklesGetBufferSize, "roi =5 res"),
      TORTURE(zeliMarkSpeckles_8u_C1IR, "io1 roi:L =0 =4 =3 =1 buf"),
      TORTURE(zeliMarkSpeckles_16u_C1IR, "io1 roi:L =0 =4 =3 =1 buf"),
      TORTURE(zeliMarkSpeckles_16s_C1IR, "io1 roi:L =0 =4 =3 =1 buf"),
      TORTURE(zeliMarkSpeckles_32f_C1IR, "io1 roi:L =0 =4 =3 =1 buf"),
      TORTURE(zeliSegmentWatershedGetBufferSize_8u_C1R, "roi res"),
      TORTURE(zeliSegmentWatershedGetBufferSize_8u16u_C1R, "roi res"),
      TORTURE(zeliSegmentWatershed_8u_C1IR, "in1 io1 roi:L =1 =1 buf"),
      TORTURE(zeliSegmentWatershed_8u16u_C1IR, "in1 io1 roi:L =2 =0 buf"),
      TORTURE(zeliSegmentGradientGetBufferSize_8u_C1R, "roi res"),
      TORTURE(zeliSegmentGradientGetBufferSize_8u_C3R, "roi res"),
      TORTURE(zeliSegmentGradient_8u_C1IR, "in1 io1 roi:L =2 =1 buf"),
      TORTURE(zeliSegmentGradient_8u_C3IR, "in3 io1 roi:L =1 =0 buf"),
      TORTURE(zeliBoundSegments_8u_C1IR, "io1 roi =255 =1"),
      TORTURE(zeliBoundSegments_16u_C1IR, "io1 roi =9 =2"),
      TORTURE(zeliBoundSegments_32s_C1IR, "io1 roi =-1 =1"),
      TORTURE(zeliInpaintInitAlloc_8u_C1R, "mask roi:L =2.5 new=inpaint_c1"),
      TORTURE(zeliInpaintInitAlloc_8u_C3R, "mask roi:L =2.5 new=inpaint_c3"),
      TORTURE(zeliInpaint_8u_C1R, "in1 out1 roi:W:H state=inpaint_c1"),
      TORTURE(zeliInpaint_8u_C3R, "in3 out3 roi:W:H state=inpaint_c3"),
  };
}
