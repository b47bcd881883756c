/* zelcv: The separable row/column filter pipeline.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_SEPFILTER_H
#define ZELCV_SEPFILTER_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Separable filter pipeline ----------------------------------------- */
/* A separable filter in two passes over rows held by the caller.
 *
 * Row pass: row y of the source ROI is filtered horizontally into dst[y]:
 *   dst[y][x] = convert(sum_k kernel[k] * s(x - xAnchor + k) / divisor)
 * (taps not reversed). Positions outside the row come from borderType, which
 * must be exactly zelBorderConstant, zelBorderReplicate or zelBorderInMemory
 * (no side flags; anything else gives zelStatusBadArgument, -5). Integer
 * members scale each tap by 1/divisor (single precision), sum in single
 * precision in tap order, clamp to the result type and truncate toward zero.
 * The _Low members sum integer products in 32 bits and apply
 * r = trunc(16384/divisor) as (sum * r) >> 14 (the shift is exact, no 32-bit
 * wrap of the product), saturating; divisor 1 skips r. 32f sums in double
 * precision and rounds once to single precision. The 16u members take signed
 * 16-bit taps.
 *
 * Column pass: reads kernelSize + height - 1 row pointers src[0], src[1], ...;
 *   dst(x, y) = convert(sum_k kernel[k] * src[y + k][x] / divisor)
 * Repeating pointers is how a caller expresses a vertical border. Integer
 * members sum in single precision and round to nearest (ties to even) at
 * every pixel; _Low as the row pass; 32f sums in single precision.
 *
 * Row checks, first failure wins: src, dst, kernel or buffer null (-8);
 * width or height < 1 (-6); any dst[0 .. height-1] null (-8); C3 members: a
 * null borderValue array (-8, whatever the border); kernelSize < 1 (-6);
 * xAnchor outside 0 .. kernelSize-1 (-34); srcStep below the row bytes
 * (-14); 16-bit srcStep odd or 32f srcStep not a multiple of 4 (-108);
 * borderType (-5); divisor: 0 refused (-5) by 16s, 8u16s_C3R and _Low, < 1
 * refused by 16u, not checked by 8u16s_C1R (a zero divisor then yields the
 * clamp limits).
 * Column checks: src, dst or kernel null (-8); width or height < 1 (-6); any
 * src[0 .. kernelSize+height-2] null (-8, before kernelSize is validated);
 * kernelSize < 1 (-6); dstStep (-14, -108); buffer null (-8); integer
 * members: divisor 0 (-5).
 *
 * Work buffers: the sizes that the GetBufferSize queries report (any
 * alignment). A query whose size would not fit in an int gives
 * zelStatusBadSize. */
#define ZELI_ROW_PIPELINE(suffix, S, D, Tap, Value)                                            \
  ZELCV_API ZelStatus ZELCV_CALL zeliFilterRowBorderPipeline_##suffix(                        \
      const S* src, int srcStep, D** dst, ZeliSize roiSize, const Tap* kernel, int kernelSize, \
      int xAnchor, ZeliBorderType borderType, Value borderValue, int divisor, Zel8u* buffer);
ZELI_ROW_PIPELINE(16s_C1R, Zel16s, Zel16s, Zel16s, Zel16s)
ZELI_ROW_PIPELINE(16s_C3R, Zel16s, Zel16s, Zel16s, const Zel16s*)
ZELI_ROW_PIPELINE(16u_C1R, Zel16u, Zel16u, Zel16s, Zel16u)
ZELI_ROW_PIPELINE(16u_C3R, Zel16u, Zel16u, Zel16s, const Zel16u*)
ZELI_ROW_PIPELINE(8u16s_C1R, Zel8u, Zel16s, Zel16s, Zel8u)
ZELI_ROW_PIPELINE(8u16s_C3R, Zel8u, Zel16s, Zel16s, const Zel8u*)
ZELI_ROW_PIPELINE(Low_16s_C1R, Zel16s, Zel16s, Zel16s, Zel16s)
ZELI_ROW_PIPELINE(Low_16s_C3R, Zel16s, Zel16s, Zel16s, const Zel16s*)
#undef ZELI_ROW_PIPELINE
ZELCV_API ZelStatus ZELCV_CALL zeliFilterRowBorderPipeline_32f_C1R(
    const Zel32f* src, int srcStep, Zel32f** dst, ZeliSize roiSize, const Zel32f* kernel,
    int kernelSize, int xAnchor, ZeliBorderType borderType, Zel32f borderValue, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterRowBorderPipeline_32f_C3R(
    const Zel32f* src, int srcStep, Zel32f** dst, ZeliSize roiSize, const Zel32f* kernel,
    int kernelSize, int xAnchor, ZeliBorderType borderType, const Zel32f* borderValue,
    Zel8u* buffer);

#define ZELI_COLUMN_PIPELINE(suffix, S, D, Tap)                                               \
  ZELCV_API ZelStatus ZELCV_CALL zeliFilterColumnPipeline_##suffix(                          \
      const S** src, D* dst, int dstStep, ZeliSize roiSize, const Tap* kernel, int kernelSize, \
      int divisor, Zel8u* buffer);
ZELI_COLUMN_PIPELINE(16s_C1R, Zel16s, Zel16s, Zel16s)
ZELI_COLUMN_PIPELINE(16s_C3R, Zel16s, Zel16s, Zel16s)
ZELI_COLUMN_PIPELINE(16s8s_C1R, Zel16s, Zel8s, Zel16s)
ZELI_COLUMN_PIPELINE(16s8s_C3R, Zel16s, Zel8s, Zel16s)
ZELI_COLUMN_PIPELINE(16s8u_C1R, Zel16s, Zel8u, Zel16s)
ZELI_COLUMN_PIPELINE(16s8u_C3R, Zel16s, Zel8u, Zel16s)
ZELI_COLUMN_PIPELINE(16u_C1R, Zel16u, Zel16u, Zel16s)
ZELI_COLUMN_PIPELINE(16u_C3R, Zel16u, Zel16u, Zel16s)
ZELI_COLUMN_PIPELINE(Low_16s_C1R, Zel16s, Zel16s, Zel16s)
ZELI_COLUMN_PIPELINE(Low_16s_C3R, Zel16s, Zel16s, Zel16s)
#undef ZELI_COLUMN_PIPELINE
ZELCV_API ZelStatus ZELCV_CALL zeliFilterColumnPipeline_32f_C1R(const Zel32f** src, Zel32f* dst, int dstStep,
                                                                ZeliSize roiSize, const Zel32f* kernel,
                                                                int kernelSize, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterColumnPipeline_32f_C3R(const Zel32f** src, Zel32f* dst, int dstStep,
                                                                ZeliSize roiSize, const Zel32f* kernel,
                                                                int kernelSize, Zel8u* buffer);

/* Work-buffer sizes: the row sizes depend on kernelSize only, the column
 * sizes on the width only. */
#define ZELI_PIPELINE_QUERY(name) \
  ZELCV_API ZelStatus ZELCV_CALL name(ZeliSize roiSize, int kernelSize, int* bufferSize);
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_16s_C1R)
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_16s_C3R)
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_16u_C1R)
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_16u_C3R)
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_32f_C1R)
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_32f_C3R)
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_8u16s_C1R)
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_8u16s_C3R)
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_Low_16s_C1R)
ZELI_PIPELINE_QUERY(zeliFilterRowBorderPipelineGetBufferSize_Low_16s_C3R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_16s_C1R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_16s_C3R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_16s8s_C1R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_16s8s_C3R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_16s8u_C1R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_16s8u_C3R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_16u_C1R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_16u_C3R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_32f_C1R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_32f_C3R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_Low_16s_C1R)
ZELI_PIPELINE_QUERY(zeliFilterColumnPipelineGetBufferSize_Low_16s_C3R)
#undef ZELI_PIPELINE_QUERY

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_SEPFILTER_H */
