// Torture table: the derivative and smoothing filters. Work buffers depend on
// the width only, so huge heights are not refused; the Gaussian filter's
// state was built for the images' ROI, and a wider ROI gives -6 (roi:W).
#include "torture/torture.h"

namespace {

zeltorture::Maker gaussian(int dataType, int channels) {
  return {[=](zeltorture::Arena& a, ZeliSize roi) -> void* {
            int stateSize = 0, bufferSize = 0;
            if (zeliFilterGaussianGetBufferSize(roi, 5, dataType, channels, &stateSize, &bufferSize)) return nullptr;
            auto* state = static_cast<ZeliFilterGaussianState*>(a.block(size_t(stateSize)));
            return zeliFilterGaussianInit(roi, 1.2f, 5, dataType, channels, state) ? nullptr : state;
          },
          nullptr};
}

}  // namespace

TORTURE_MAKER(gauss_8u_C1, gaussian(zel8u, 1));
TORTURE_MAKER(gauss_8u_C3, gaussian(zel8u, 3));
TORTURE_MAKER(gauss_16u_C1, gaussian(zel16u, 1));
TORTURE_MAKER(gauss_16u_C3, gaussian(zel16u, 3));
TORTURE_MAKER(gauss_32f_C1, gaussian(zel32f, 1));
TORTURE_MAKER(gauss_32f_C3, gaussian(zel32f, 3));

#define kFilter "in1 out1 roi =55 border=1,0,3,6,0x31 =0 buf"
#define kScharr "in1 out1 roi =33 border=1,0,3,6,0x31 =0 buf"
#define kQuery "roi =55 res"
#define kScharrQuery "roi =33 res"

TORTURE_FAMILY(filters) {
  return {
      TORTURE(zeliFilterSobelHorizGetBufferSize_8u8s_C1R, kQuery),
      TORTURE(zeliFilterSobelHorizBorder_8u8s_C1R, kFilter),
      TORTURE(zeliFilterSobelVertGetBufferSize_8u8s_C1R, kQuery),
      TORTURE(zeliFilterSobelVertBorder_8u8s_C1R, kFilter),
      TORTURE(zeliFilterSobelNegVertGetBufferSize_8u16s_C1R, kQuery),
      TORTURE(zeliFilterSobelNegVertBorder_8u16s_C1R, kFilter),
      TORTURE(zeliFilterSobelNegVertGetBufferSize_8u8s_C1R, kQuery),
      TORTURE(zeliFilterSobelNegVertBorder_8u8s_C1R, kFilter),
      TORTURE(zeliFilterSobelNegVertGetBufferSize_32f_C1R, kQuery),
      TORTURE(zeliFilterSobelNegVertBorder_32f_C1R, kFilter),
      TORTURE(zeliFilterSobelHorizSecondGetBufferSize_8u16s_C1R, kQuery),
      TORTURE(zeliFilterSobelHorizSecondBorder_8u16s_C1R, kFilter),
      TORTURE(zeliFilterSobelHorizSecondGetBufferSize_8u8s_C1R, kQuery),
      TORTURE(zeliFilterSobelHorizSecondBorder_8u8s_C1R, kFilter),
      TORTURE(zeliFilterSobelHorizSecondGetBufferSize_32f_C1R, kQuery),
      TORTURE(zeliFilterSobelHorizSecondBorder_32f_C1R, kFilter),
      TORTURE(zeliFilterSobelVertSecondGetBufferSize_8u16s_C1R, kQuery),
      TORTURE(zeliFilterSobelVertSecondBorder_8u16s_C1R, kFilter),
      TORTURE(zeliFilterSobelVertSecondGetBufferSize_8u8s_C1R, kQuery),
      TORTURE(zeliFilterSobelVertSecondBorder_8u8s_C1R, kFilter),
      TORTURE(zeliFilterSobelVertSecondGetBufferSize_32f_C1R, kQuery),
      TORTURE(zeliFilterSobelVertSecondBorder_32f_C1R, kFilter),
      TORTURE(zeliFilterSobelCrossGetBufferSize_8u16s_C1R, kQuery),
      TORTURE(zeliFilterSobelCrossBorder_8u16s_C1R, kFilter),
      TORTURE(zeliFilterSobelCrossGetBufferSize_8u8s_C1R, kQuery),
      TORTURE(zeliFilterSobelCrossBorder_8u8s_C1R, kFilter),
      TORTURE(zeliFilterSobelCrossGetBufferSize_32f_C1R, kQuery),
      TORTURE(zeliFilterSobelCrossBorder_32f_C1R, kFilter),
      TORTURE(zeliFilterScharrHorizGetBufferSize_8u16s_C1R, kScharrQuery),
      TORTURE(zeliFilterScharrHorizBorder_8u16s_C1R, kScharr),
      TORTURE(zeliFilterScharrHorizGetBufferSize_8u8s_C1R, kScharrQuery),
      TORTURE(zeliFilterScharrHorizBorder_8u8s_C1R, kScharr),
      TORTURE(zeliFilterScharrHorizGetBufferSize_32f_C1R, kScharrQuery),
      TORTURE(zeliFilterScharrHorizBorder_32f_C1R, kScharr),
      TORTURE(zeliFilterScharrVertGetBufferSize_8u16s_C1R, kScharrQuery),
      TORTURE(zeliFilterScharrVertBorder_8u16s_C1R, kScharr),
      TORTURE(zeliFilterScharrVertGetBufferSize_8u8s_C1R, kScharrQuery),
      TORTURE(zeliFilterScharrVertBorder_8u8s_C1R, kScharr),
      TORTURE(zeliFilterScharrVertGetBufferSize_32f_C1R, kScharrQuery),
      TORTURE(zeliFilterScharrVertBorder_32f_C1R, kScharr),
      TORTURE(zeliFilterLaplacianGetBufferSize_8u16s_C1R, kQuery),
      TORTURE(zeliFilterLaplacianBorder_8u16s_C1R, kFilter),
      TORTURE(zeliFilterLaplacianGetBufferSize_8u8s_C1R, kQuery),
      TORTURE(zeliFilterLaplacianBorder_8u8s_C1R, kFilter),
      TORTURE(zeliFilterLaplacianGetBufferSize_32f_C1R, kQuery),
      TORTURE(zeliFilterLaplacianBorder_32f_C1R, kFilter),
      TORTURE(zeliFilterLowpassGetBufferSize_8u_C1R, kQuery),
      TORTURE(zeliFilterLowpassBorder_8u_C1R, kFilter),
      TORTURE(zeliFilterLowpassGetBufferSize_32f_C1R, kQuery),
      TORTURE(zeliFilterLowpassBorder_32f_C1R, kFilter),
      TORTURE(zeliFilterGaussGetBufferSize_32f_C1R, kQuery),
      TORTURE(zeliFilterGaussBorder_32f_C1R, kFilter),
      TORTURE(zeliFilterGaussianGetBufferSize, "roi =5 =1 =3 res res"),
      TORTURE(zeliFilterGaussianInit, "roi =1.2 =5 =1 =3 blk=128"),
      TORTURE(zeliFilterGaussianBorder_8u_C1R, "in1 out1 roi:W border=1,0,6,0x31 =0 state=gauss_8u_C1 buf"),
      TORTURE(zeliFilterGaussianBorder_8u_C3R, "in3 out3 roi:W border=1,0,6,0x31 arr=3,0 state=gauss_8u_C3 buf"),
      TORTURE(zeliFilterGaussianBorder_16u_C1R, "in1 out1 roi:W border=1,0,6,0x31 =0 state=gauss_16u_C1 buf"),
      TORTURE(zeliFilterGaussianBorder_16u_C3R, "in3 out3 roi:W border=1,0,6,0x31 arr=3,0 state=gauss_16u_C3 buf"),
      TORTURE(zeliFilterGaussianBorder_32f_C1R, "in1 out1 roi:W border=1,0,6,0x31 =0 state=gauss_32f_C1 buf"),
      TORTURE(zeliFilterGaussianBorder_32f_C3R, "in3 out3 roi:W border=1,0,6,0x31 arr=3,0 state=gauss_32f_C3 buf"),
      TORTURE(zeliGenSobelKernel_16s, "arr=5,0 =5 =1"),
      TORTURE(zeliGenSobelKernel_32f, "arr=5,0 =5 =1"),
  };
}
