// Add, AddSquare, AddProduct and AddWeighted: updates of a 32f accumulator
// from 8u, 8s, 16u or 32f sources, plain or under a mask.
#include "arith/store_mode.h"
#include "core/status.h"
#include "kernels/accumulate.h"
#include "kernels/dispatch.h"

namespace zelcv {
namespace {

template <int kSources, bool kMasked, bool kInPlace, typename Src, typename Formula>
void run(StoreMode mode, const accumulate::Images<Src>& images, ZeliSize roi, Formula f) {
  withChosenIsa<IsaLevel::Avx512>([&](auto isa) {
    using Isa = typename decltype(isa)::Isa;
    accumulate::run<kSources, kMasked, kInPlace, Src, Formula, Isa>(mode, images, roi.width, roi.height, f);
  });
}

constexpr int kSinglePath = 0;  // no cache query, ordinary stores

// Checks the images in argument order (first source, second source, mask,
// accumulator), then runs the formula in place over the accumulator. A
// non-zero `bytesPerPixel` selects the store mode by the cache rule.
template <int kSources, bool kMasked, typename Src, typename Formula>
ZelStatus update(const Src* src1, int src1Step, const Src* src2, int src2Step, const Zel8u* mask, int maskStep,
                 Zel32f* acc, int accStep, ZeliSize roi, int bytesPerPixel, Formula f) {
  ZelStatus status;
  if (kSources == 2 && kMasked)
    status = checkImages(
        {image(src1, src1Step), image(src2, src2Step), maskImage(mask, maskStep), image(acc, accStep)}, roi);
  else if (kSources == 2)
    status = checkImages({image(src1, src1Step), image(src2, src2Step), image(acc, accStep)}, roi);
  else if (kMasked)
    status = checkImages({image(src1, src1Step), maskImage(mask, maskStep), image(acc, accStep)}, roi);
  else
    status = checkImages({image(src1, src1Step), image(acc, accStep)}, roi);
  if (status) return status;

  StoreMode mode = bytesPerPixel ? chooseStoreMode(bytesPerPixel, roi) : StoreMode::Ordinary;
  accumulate::Images<Src> images{{src1, src1Step}, {src2, src2Step}, {mask, maskStep}, {acc, accStep}, {acc, accStep}};
  run<kSources, kMasked, true>(mode, images, roi, f);
  return zelStatusOk;
}

template <typename Src, typename Formula>
ZelStatus update1(const Src* src, int srcStep, Zel32f* acc, int accStep, ZeliSize roi, Formula f) {
  return update<1, false>(src, srcStep, static_cast<const Src*>(nullptr), 0, nullptr, 0, acc, accStep, roi,
                          kSinglePath, f);
}

template <typename Src, typename Formula>
ZelStatus update1Masked(const Src* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* acc, int accStep,
                        ZeliSize roi, int bytesPerPixel, Formula f) {
  return update<1, true>(src, srcStep, static_cast<const Src*>(nullptr), 0, mask, maskStep, acc, accStep, roi,
                         bytesPerPixel, f);
}

}  // namespace
}  // namespace zelcv

using zelcv::kSinglePath;
using zelcv::run;
using zelcv::update;
using zelcv::update1;
using zelcv::update1Masked;
namespace formula = zelcv::accumulate;

// One source: Add, AddSquare (all single path).
#define ZELCV_ACCUMULATE_IR(name, T, Formula)                                                     \
  ZELCV_ENTRY(name)(const T* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize) { \
    return update1(src, srcStep, srcDst, srcDstStep, roiSize, Formula());                         \
  }
#define ZELCV_ACCUMULATE_IMR(name, T, Formula)                                                   \
  ZELCV_ENTRY(name)(const T* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, \
                    int srcDstStep, ZeliSize roiSize) {                                         \
    return update1Masked(src, srcStep, mask, maskStep, srcDst, srcDstStep, roiSize, kSinglePath, \
                         Formula());                                                             \
  }

ZELCV_ACCUMULATE_IR(zeliAdd_8u32f_C1IR, Zel8u, formula::Add)
ZELCV_ACCUMULATE_IR(zeliAdd_8s32f_C1IR, Zel8s, formula::Add)
ZELCV_ACCUMULATE_IR(zeliAdd_16u32f_C1IR, Zel16u, formula::Add)
ZELCV_ACCUMULATE_IMR(zeliAdd_8u32f_C1IMR, Zel8u, formula::Add)
ZELCV_ACCUMULATE_IMR(zeliAdd_8s32f_C1IMR, Zel8s, formula::Add)
ZELCV_ACCUMULATE_IMR(zeliAdd_16u32f_C1IMR, Zel16u, formula::Add)
ZELCV_ACCUMULATE_IMR(zeliAdd_32f_C1IMR, Zel32f, formula::Add)

ZELCV_ACCUMULATE_IR(zeliAddSquare_8u32f_C1IR, Zel8u, formula::AddSquare)
ZELCV_ACCUMULATE_IR(zeliAddSquare_8s32f_C1IR, Zel8s, formula::AddSquare)
ZELCV_ACCUMULATE_IR(zeliAddSquare_16u32f_C1IR, Zel16u, formula::AddSquare)
ZELCV_ACCUMULATE_IR(zeliAddSquare_32f_C1IR, Zel32f, formula::AddSquare)
ZELCV_ACCUMULATE_IMR(zeliAddSquare_8u32f_C1IMR, Zel8u, formula::AddSquare)
ZELCV_ACCUMULATE_IMR(zeliAddSquare_8s32f_C1IMR, Zel8s, formula::AddSquare)
ZELCV_ACCUMULATE_IMR(zeliAddSquare_16u32f_C1IMR, Zel16u, formula::AddSquare)
ZELCV_ACCUMULATE_IMR(zeliAddSquare_32f_C1IMR, Zel32f, formula::AddSquare)

// Two sources: AddProduct; the masked ones choose the store mode.
#define ZELCV_ADD_PRODUCT_IR(name, T)                                                                   \
  ZELCV_ENTRY(name)(const T* src1, int src1Step, const T* src2, int src2Step, Zel32f* srcDst,          \
                    int srcDstStep, ZeliSize roiSize) {                                                 \
    return update<2, false>(src1, src1Step, src2, src2Step, nullptr, 0, srcDst, srcDstStep, roiSize,    \
                            kSinglePath, formula::AddProduct());                                        \
  }
#define ZELCV_ADD_PRODUCT_IMR(name, T, bytesPerPixel)                                                        \
  ZELCV_ENTRY(name)(const T* src1, int src1Step, const T* src2, int src2Step, const Zel8u* mask, int maskStep, \
                    Zel32f* srcDst, int srcDstStep, ZeliSize roiSize) {                                       \
    return update<2, true>(src1, src1Step, src2, src2Step, mask, maskStep, srcDst, srcDstStep, roiSize,       \
                           bytesPerPixel, formula::AddProduct());                                             \
  }

ZELCV_ADD_PRODUCT_IR(zeliAddProduct_8u32f_C1IR, Zel8u)
ZELCV_ADD_PRODUCT_IR(zeliAddProduct_8s32f_C1IR, Zel8s)
ZELCV_ADD_PRODUCT_IR(zeliAddProduct_16u32f_C1IR, Zel16u)
ZELCV_ADD_PRODUCT_IR(zeliAddProduct_32f_C1IR, Zel32f)
ZELCV_ADD_PRODUCT_IMR(zeliAddProduct_8u32f_C1IMR, Zel8u, 7)
ZELCV_ADD_PRODUCT_IMR(zeliAddProduct_8s32f_C1IMR, Zel8s, 7)
ZELCV_ADD_PRODUCT_IMR(zeliAddProduct_16u32f_C1IMR, Zel16u, 9)
ZELCV_ADD_PRODUCT_IMR(zeliAddProduct_32f_C1IMR, Zel32f, 13)

// AddWeighted; the masked ones choose the store mode. The 8-bit ones count 5
// bytes per pixel although they touch 6: a deliberate part of the tuning.
#define ZELCV_ADD_WEIGHTED_IR(name, T)                                                                  \
  ZELCV_ENTRY(name)(const T* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize,       \
                    Zel32f alpha) {                                                                     \
    return update1(src, srcStep, srcDst, srcDstStep, roiSize, formula::AddWeighted{alpha});             \
  }
#define ZELCV_ADD_WEIGHTED_IMR(name, T, bytesPerPixel)                                                  \
  ZELCV_ENTRY(name)(const T* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst,       \
                    int srcDstStep, ZeliSize roiSize, Zel32f alpha) {                                   \
    return update1Masked(src, srcStep, mask, maskStep, srcDst, srcDstStep, roiSize, bytesPerPixel,      \
                         formula::AddWeighted{alpha});                                                  \
  }

ZELCV_ADD_WEIGHTED_IR(zeliAddWeighted_8u32f_C1IR, Zel8u)
ZELCV_ADD_WEIGHTED_IR(zeliAddWeighted_8s32f_C1IR, Zel8s)
ZELCV_ADD_WEIGHTED_IR(zeliAddWeighted_16u32f_C1IR, Zel16u)
ZELCV_ADD_WEIGHTED_IR(zeliAddWeighted_32f_C1IR, Zel32f)
ZELCV_ADD_WEIGHTED_IMR(zeliAddWeighted_8u32f_C1IMR, Zel8u, 5)
ZELCV_ADD_WEIGHTED_IMR(zeliAddWeighted_8s32f_C1IMR, Zel8s, 5)
ZELCV_ADD_WEIGHTED_IMR(zeliAddWeighted_16u32f_C1IMR, Zel16u, 7)
ZELCV_ADD_WEIGHTED_IMR(zeliAddWeighted_32f_C1IMR, Zel32f, 9)

// dst = (src1 - src2) x alpha + src2: the running-average formula with src2
// as the accumulator read and dst as the one written.
ZELCV_ENTRY(zeliAddWeighted_32f_C1R)(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step,
                                     Zel32f* dst, int dstStep, ZeliSize roiSize, Zel32f alpha) {
  using namespace zelcv;
  if (ZelStatus s = checkImages({image(src1, src1Step), image(src2, src2Step), image(dst, dstStep)}, roiSize))
    return s;
  accumulate::Images<Zel32f> images{{src1, src1Step}, {nullptr, 0}, {nullptr, 0}, {src2, src2Step}, {dst, dstStep}};
  run<1, false, false>(StoreMode::Ordinary, images, roiSize, accumulate::AddWeighted{alpha});
  return zelStatusOk;
}
