/* zelcv: Accumulation into floating-point images and absolute differences.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_ACCUMULATE_H
#define ZELCV_ACCUMULATE_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Accumulation and absolute differences ---------------------------- */
/* A 32f accumulator image (srcDst) is updated from 8u, 8s, 16u or 32f sources,
 * pixel by pixel in single precision, each operation rounded as written:
 *   Add          a = a + s
 *   AddSquare    a = a + s * s
 *   AddProduct   a = a + s1 * s2
 *   AddWeighted  a = (s - a) * alpha + a   (alpha is not range-checked)
 * AddWeighted_32f_C1R writes dst = (src1 - src2) * alpha + src2.
 * Masked (M) variants update only pixels whose 8u mask byte is non-zero and
 * leave the others bit-identical. AbsDiff writes |src1 - src2| and AbsDiffC
 * |src - value|; for 8u and 16u the value is first clamped to the type's range,
 * for 32f the result is the difference with its sign bit cleared.
 * AbsDiff_8u_C3R is the one-channel operation over 3 x width elements.
 *
 * Several of these functions ask zelGetMaxCacheSizeB on every call and write
 * with non-temporal stores (followed by a store fence) when the bytes that the
 * call touches are not below the reported cache size, or when the query fails.
 * The results are identical either way. */
ZELCV_API ZelStatus ZELCV_CALL zeliAdd_8u32f_C1IR(const Zel8u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAdd_8s32f_C1IR(const Zel8s* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAdd_16u32f_C1IR(const Zel16u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAdd_8u32f_C1IMR(const Zel8u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAdd_8s32f_C1IMR(const Zel8s* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAdd_16u32f_C1IMR(const Zel16u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAdd_32f_C1IMR(const Zel32f* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);

ZELCV_API ZelStatus ZELCV_CALL zeliAddSquare_8u32f_C1IR(const Zel8u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddSquare_8s32f_C1IR(const Zel8s* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddSquare_16u32f_C1IR(const Zel16u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddSquare_32f_C1IR(const Zel32f* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddSquare_8u32f_C1IMR(const Zel8u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddSquare_8s32f_C1IMR(const Zel8s* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddSquare_16u32f_C1IMR(const Zel16u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddSquare_32f_C1IMR(const Zel32f* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);

ZELCV_API ZelStatus ZELCV_CALL zeliAddProduct_8u32f_C1IR(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddProduct_8s32f_C1IR(const Zel8s* src1, int src1Step, const Zel8s* src2, int src2Step, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddProduct_16u32f_C1IR(const Zel16u* src1, int src1Step, const Zel16u* src2, int src2Step, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddProduct_32f_C1IR(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddProduct_8u32f_C1IMR(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddProduct_8s32f_C1IMR(const Zel8s* src1, int src1Step, const Zel8s* src2, int src2Step, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddProduct_16u32f_C1IMR(const Zel16u* src1, int src1Step, const Zel16u* src2, int src2Step, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAddProduct_32f_C1IMR(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);

ZELCV_API ZelStatus ZELCV_CALL zeliAddWeighted_8u32f_C1IR(const Zel8u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus ZELCV_CALL zeliAddWeighted_8s32f_C1IR(const Zel8s* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus ZELCV_CALL zeliAddWeighted_16u32f_C1IR(const Zel16u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus ZELCV_CALL zeliAddWeighted_32f_C1IR(const Zel32f* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus ZELCV_CALL zeliAddWeighted_8u32f_C1IMR(const Zel8u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus ZELCV_CALL zeliAddWeighted_8s32f_C1IMR(const Zel8s* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus ZELCV_CALL zeliAddWeighted_16u32f_C1IMR(const Zel16u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus ZELCV_CALL zeliAddWeighted_32f_C1IMR(const Zel32f* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus ZELCV_CALL zeliAddWeighted_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step, Zel32f* dst, int dstStep, ZeliSize roiSize, Zel32f alpha);

ZELCV_API ZelStatus ZELCV_CALL zeliAbsDiff_8u_C1R(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, Zel8u* dst, int dstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAbsDiff_8u_C3R(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, Zel8u* dst, int dstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAbsDiff_16u_C1R(const Zel16u* src1, int src1Step, const Zel16u* src2, int src2Step, Zel16u* dst, int dstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAbsDiff_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step, Zel32f* dst, int dstStep, ZeliSize roiSize);
ZELCV_API ZelStatus ZELCV_CALL zeliAbsDiffC_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, int value);
ZELCV_API ZelStatus ZELCV_CALL zeliAbsDiffC_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst, int dstStep, ZeliSize roiSize, int value);
ZELCV_API ZelStatus ZELCV_CALL zeliAbsDiffC_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, Zel32f value);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_ACCUMULATE_H */
