// Torture table: foreground models, the mixture model and super-resolution.
// Models are built for the images' ROI; a ROI other than the model's is -6
// after the step checks (:L). The super-resolution calls take the
// high-resolution image and its size at twice the ROI, with a scale-2 state.
#include <vector>

#include "torture/torture.h"

namespace {

template <typename State, typename Init, typename Free>
zeltorture::Maker frameModel(Init init, Free release, int channels) {
  return zeltorture::Maker{[=](zeltorture::Arena& a, ZeliSize roi) -> void* {
                             const int step = roi.width * channels;
                             void* frame = a.block(std::size_t(step) * std::size_t(roi.height));
                             State* st = nullptr;
                             return init(static_cast<const Zel8u*>(frame), step, roi, &st, nullptr) == zelStatusOk
                                        ? st
                                        : nullptr;
                           },
                           [=](void* p) { release(static_cast<State*>(p)); }};
}

template <typename Init, typename Free>
zeltorture::Maker superRes(Init init, Free release) {
  return zeltorture::Maker{[=](zeltorture::Arena&, ZeliSize) -> void* {
                             const Zel32f psf[9] = {0.25f, 0.25f, 0.25f, 0.25f, 0.1f, 0.1f, 0.1f, 0.1f, 0.1f};
                             ZeliSRHNState* st = nullptr;
                             return init(&st, psf, 2) == zelStatusOk ? st : nullptr;
                           },
                           [=](void* p) { release(static_cast<ZeliSRHNState*>(p)); }};
}

}  // namespace

#define FRAME_MODELS(c)                                                                                          \
  static const ::zeltorture::Registrar tortureMaker_fghist##c(                                                  \
      "fghist" #c, frameModel<ZeliFGHistogramState>(zeliForegroundHistogramInitAlloc_8u_C##c##R,               \
                                                    zeliForegroundHistogramFree_8u_C##c##R, c));                \
  static const ::zeltorture::Registrar tortureMaker_fggauss##c(                                                 \
      "fggauss" #c, frameModel<ZeliFGGaussianState>(zeliForegroundGaussianInitAlloc_8u_C##c##R,                \
                                                    zeliForegroundGaussianFree_8u_C##c##R, c));
FRAME_MODELS(1)
FRAME_MODELS(3)
#undef FRAME_MODELS

static const ::zeltorture::Registrar tortureMaker_srhn2("srhn2", superRes(zeliSRHNInitAlloc_PSF2x2, zeliSRHNFree_PSF2x2));
static const ::zeltorture::Registrar tortureMaker_srhn3("srhn3", superRes(zeliSRHNInitAlloc_PSF3x3, zeliSRHNFree_PSF3x3));

TORTURE_MAKER(fgmm,
              [](zeltorture::Arena& a, ZeliSize roi) -> void* {
                int bytes = 0;
                if (zeliFGMMGetBufferSize_8u_C3R(roi, 3, &bytes) != zelStatusOk) return nullptr;
                void* block = a.block(std::size_t(bytes));
                return zeliFGMMInit_8u_C3R(roi, 3, nullptr, static_cast<ZeliFGMMState*>(block)) == zelStatusOk
                           ? block
                           : nullptr;
              },
              nullptr);

#define MODEL_CALLS(kind, name, c)                                                                            \
  TORTURE(zeliForeground##name##InitAlloc_8u_C##c##R, "in" #c " roi:L new=" #kind #c " null"),              \
      TORTURE(zeliForeground##name##Free_8u_C##c##R, "obj=" #kind #c),                                       \
      TORTURE(zeliForeground##name##_8u_C##c##R, "in" #c " out1 roi:L state=" #kind #c),                     \
      TORTURE(zeliForeground##name##Update_8u_C##c##R, "in" #c " roi:L state=" #kind #c)

TORTURE_FAMILY(background) {
  return {
      MODEL_CALLS(fghist, Histogram, 1),
      MODEL_CALLS(fghist, Histogram, 3),
      MODEL_CALLS(fggauss, Gaussian, 1),
      MODEL_CALLS(fggauss, Gaussian, 3),
      TORTURE(zeliFGMMGetBufferSize_8u_C3R, "roi:H =3 res"),
      TORTURE(zeliFGMMInit_8u_C3R, "roi:H =3 null blk"),
      TORTURE(zeliFGMMForeground_8u_C3R, "in3 out1 roi:L state=fgmm"),
      TORTURE(zeliFGMMBackground_8u_C3R, "out3 roi:L state=fgmm"),
      TORTURE(zeliSRHNInitAlloc_PSF2x2, "new=srhn2 arr=4,0.25 =2"),
      TORTURE(zeliSRHNInitAlloc_PSF3x3, "new=srhn3 arr=9,0.1 =2"),
      TORTURE(zeliSRHNFree_PSF2x2, "obj=srhn2"),
      TORTURE(zeliSRHNFree_PSF3x3, "obj=srhn3"),
      TORTURE(zeliSRHNCalcResidual_PSF2x2_8u32f_C1R, "in1 in1:x2 out1 roi roi:x2 pt=1,-1 state=srhn2"),
      TORTURE(zeliSRHNCalcResidual_PSF3x3_8u32f_C1R, "in1 in1:x2 out1 roi roi:x2 pt=-2,1 state=srhn3"),
      TORTURE(zeliSRHNUpdateGradient_PSF2x2_32f_C1R, "in1 io1:x2 roi roi:x2 pt=0,1 state=srhn2"),
      TORTURE(zeliSRHNUpdateGradient_PSF3x3_32f_C1R, "in1 io1:x2 roi roi:x2 pt=1,1 state=srhn3"),
  };
}
