/* zelcv: image pyramids: the Gaussian 5x5 pair, pyramid size arithmetic, the
 * pyramid record and the layer states.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_PYRAMID_H
#define ZELCV_PYRAMID_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Gaussian 5x5 down and up ------------------------------------------ */
/* roiSize is the SOURCE size (w, h) in both directions.
 *
 * Down: the destination has ((w + 1) / 2) x ((h + 1) / 2) pixels; pixel
 * (i, j) is centred on source pixel (2i, 2j) with the weights
 * (1 4 6 4 1)^T (1 4 6 4 1) / 256. Positions outside the source reflect
 * about the edge pixel without repeating it (-1 reads 1, w reads w - 2, and
 * on and on for tiny images; a width of 1 reads pixel 0). Rows are filtered
 * first: h = (s[-2] + s[2]) + (s[-1] + s[1]) * 4 + s[0] * 6, then the five
 * filtered rows combine the same way. 8u/8s: (sum + 128) >> 8 (arithmetic
 * shift, floor). 32f: the same expression in single precision, in that order,
 * times 1/256. Images of one or two rows: each output is (h(row 0) +
 * h(row 1)) scaled by 1/32 (integers: (sum * 8 + 128) >> 8; a single row is
 * used twice).
 *
 * Up: the destination has 2w x 2h pixels. Along each axis index 2k gets
 * (x[k-1] + x[k+1]) + x[k] * 6 and index 2k + 1 gets (x[k] + x[k+1]) * 4
 * (eighths). x[-1] reads x[1] (reflection; x[0] when the size is 1) and
 * x[n] reads x[n-1] (replication), at the left and right as at the top and
 * bottom. Rows are expanded first, then the rows combine. 8u/8s:
 * (sum of 64ths + 32) >> 6; 32f: single precision in that order, times 1/64.
 *
 * Checks, first failure wins: src, dst or buffer null (-8); w or h < 1 (-6);
 * srcStep below w * channels * element size, or dstStep below the
 * destination's row bytes (-14); 32f: a step not a multiple of 4 (-108).
 *
 * Work buffers (any alignment), for the source width w, c channels:
 *   down: ((w * 4 * c + 15) >> 4) * 96 + 64 bytes
 *   up:   ((w * 8 * c + 15) >> 4) * 48 + 64 bytes
 * The queries take dataType 1 (8u), 3 (8s) or 13 (32f), else -12, and
 * channels 1 or 3, else -53; bufferSize null gives -8 and roiWidth < 1 -6
 * (first); a size that does not fit in an int gives -6. */
ZELCV_API ZelStatus ZELCV_CALL zeliPyrDownGetBufSize_Gauss5x5(int roiWidth, ZelDataType dataType, int channels,
                                                              int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliPyrUpGetBufSize_Gauss5x5(int roiWidth, ZelDataType dataType, int channels,
                                                            int* bufferSize);

#define ZELI_PYR_GAUSS(op, suffix, T)                                                                 \
  ZELCV_API ZelStatus ZELCV_CALL zeli##op##_Gauss5x5_##suffix(const T* src, int srcStep, T* dst, int dstStep, \
                                                            ZeliSize roiSize, Zel8u* buffer);
ZELI_PYR_GAUSS(PyrDown, 8u_C1R, Zel8u)
ZELI_PYR_GAUSS(PyrDown, 8u_C3R, Zel8u)
ZELI_PYR_GAUSS(PyrDown, 8s_C1R, Zel8s)
ZELI_PYR_GAUSS(PyrDown, 8s_C3R, Zel8s)
ZELI_PYR_GAUSS(PyrDown, 32f_C1R, Zel32f)
ZELI_PYR_GAUSS(PyrDown, 32f_C3R, Zel32f)
ZELI_PYR_GAUSS(PyrUp, 8u_C1R, Zel8u)
ZELI_PYR_GAUSS(PyrUp, 8u_C3R, Zel8u)
ZELI_PYR_GAUSS(PyrUp, 8s_C1R, Zel8s)
ZELI_PYR_GAUSS(PyrUp, 8s_C3R, Zel8s)
ZELI_PYR_GAUSS(PyrUp, 32f_C1R, Zel32f)
ZELI_PYR_GAUSS(PyrUp, 32f_C3R, Zel32f)
#undef ZELI_PYR_GAUSS

/* ---- Size arithmetic for a rate in (1, 10] -------------------------------
 * Per dimension n, products in single precision truncated toward zero:
 *   up range of n:  largest  max(n + 1, trunc(n * rate)),
 *                   smallest 1 when n is 1, else max(n + 1, trunc((n - 1) * rate) + 1).
 *   down size of n: the c whose up range holds n, searched from
 *                   max(1, trunc(n / rate + 0.5)) (height, then width).
 * The up ranges of successive sizes are adjacent, so every n has one down
 * size (rate 2: 5 -> 3, since the up range of 2 is 3..4).
 * Checks: a null output (-8), a source dimension < 1 (-6), rate outside
 * (1, 10] (-5); an up size beyond INT_MAX gives -6. */
ZELCV_API ZelStatus ZELCV_CALL zeliGetPyramidDownROI(ZeliSize srcRoi, ZeliSize* dstRoi, Zel32f rate);
ZELCV_API ZelStatus ZELCV_CALL zeliGetPyramidUpROI(ZeliSize srcRoi, ZeliSize* dstRoiMin, ZeliSize* dstRoiMax,
                                                  Zel32f rate);

/* ---- The pyramid record ---------------------------------------------------
 * One block from zelMalloc holding the record and its arrays (each at an
 * 8-byte-aligned address inside it), released by zeliPyramidFree. Level 0 is
 * the base; level i + 1 has the down size of level i; scales[i + 1] =
 * scales[i] * (1.0 / rate) in double precision (scales[0] = 1). images and
 * steps start as nulls and zeros and layerState as null, for the caller to
 * fill. level is the top index: the requested level, or fewer when the sizes
 * reach 1 x 1 sooner (both dimensions below 2).
 * Checks: pyramid null (-8); height or width < 1 (-6); rate outside (1, 10]
 * or level < 1 (-5); out of memory (-9, *pyramid untouched). */
typedef struct ZeliPyramidLayerState ZeliPyramidLayerState;
typedef struct ZeliPyramid {
  Zel8u** images;
  ZeliSize* roiSizes;
  Zel64f* scales;
  int* steps;
  ZeliPyramidLayerState* layerState;
  int level;
} ZeliPyramid;

ZELCV_API ZelStatus ZELCV_CALL zeliPyramidInitAlloc(ZeliPyramid** pyramid, int level, ZeliSize roiSize,
                                                   Zel32f rate);
ZELCV_API ZelStatus ZELCV_CALL zeliPyramidFree(ZeliPyramid* pyramid);

/* ---- Layer states ----------------------------------------------------------
 * A layer state keeps the rate, the kernel, the chain of level sizes of the
 * base size srcRoi (the down sizes until both dimensions are below 2) and
 * work rows for sources up to the base width. It is one block; any of the
 * twelve Free functions releases it (null gives -8).
 *
 * The kernel (kerSize taps, odd, at least 3) is made symmetric: taps 0 .. r
 * (r = kerSize / 2) are used, tap r + d equals tap r - d. It is normalised
 * by the sum S of all kerSize taps as given (a sum of 0 counts as 1):
 *   8u:  t = ((k * 16384) / S) >> 1, applied as t / 8192;
 *   16u: t = ((k * 16384) / S) >> 2, applied as t / 4096;
 *   32f: t = k / S (single precision).
 * (/ truncates toward zero, >> is arithmetic.)
 *
 * Filtering (all types in single precision): each source row is filtered
 * with the taps, positions outside the row reflected as in PyrDown; the
 * filtered rows combine the same way down the columns. Products are added in
 * tap order 0 .. kerSize - 1.
 * Resampling, per axis with p = position in the filtered image:
 *   down: p = x * rate; up: p = x / rate (single precision), clamped to
 *   [0, n - 1]; i = (int)p, f = p - i, value = a + (b - a) * f with
 *   a = F[i], b = F[min(i + 1, n - 1)]; rows first, then columns.
 *   Down with |rate - 2| <= 0.00002 reads F[2x] exactly.
 * 8u and 16u results: trunc(value + 0.5) saturated to the type.
 *
 * InitAlloc checks: state or kernel null (-8); srcRoi < 1 (-6); mode other
 * than 2 (-5); rate outside (1, 10] or kerSize < 3 or even (-5); out of
 * memory (-9, *state untouched).
 * Layer operation checks: src, dst or state null (-8); srcRoi < 1 (-6);
 * srcStep, dstStep below their row bytes (-14); 16u and 32f steps not a
 * multiple of the element size (-108); a state that is not a layer state of
 * this direction (-17), whose rate is outside (1, 10] (-5), of another
 * element type (-12) or channel count (-53); then the destination size (-6):
 *   down: the size after the first chain entry with the source's height
 *   (widths not compared), or the down size of srcRoi when no entry has it;
 *   up: within the up range of srcRoi;
 * then a source wider than the state's base (-6). LayerUp may allocate
 * (-9). */
#define ZELI_PYR_LAYER(suffix, T, Tap)                                                                     \
  ZELCV_API ZelStatus ZELCV_CALL zeliPyramidLayerDownInitAlloc_##suffix(                                   \
      ZeliPyramidLayerState** state, ZeliSize srcRoi, Zel32f rate, const Tap* kernel, int kerSize, int mode); \
  ZELCV_API ZelStatus ZELCV_CALL zeliPyramidLayerUpInitAlloc_##suffix(                                     \
      ZeliPyramidLayerState** state, ZeliSize srcRoi, Zel32f rate, const Tap* kernel, int kerSize, int mode); \
  ZELCV_API ZelStatus ZELCV_CALL zeliPyramidLayerDown_##suffix(const T* src, int srcStep, ZeliSize srcRoi,    \
                                                             T* dst, int dstStep, ZeliSize dstRoi,         \
                                                             ZeliPyramidLayerState* state);                \
  ZELCV_API ZelStatus ZELCV_CALL zeliPyramidLayerUp_##suffix(const T* src, int srcStep, ZeliSize srcRoi,      \
                                                           T* dst, int dstStep, ZeliSize dstRoi,           \
                                                           ZeliPyramidLayerState* state);                  \
  ZELCV_API ZelStatus ZELCV_CALL zeliPyramidLayerDownFree_##suffix(ZeliPyramidLayerState* state);          \
  ZELCV_API ZelStatus ZELCV_CALL zeliPyramidLayerUpFree_##suffix(ZeliPyramidLayerState* state);
ZELI_PYR_LAYER(8u_C1R, Zel8u, Zel16s)
ZELI_PYR_LAYER(8u_C3R, Zel8u, Zel16s)
ZELI_PYR_LAYER(16u_C1R, Zel16u, Zel16s)
ZELI_PYR_LAYER(16u_C3R, Zel16u, Zel16s)
ZELI_PYR_LAYER(32f_C1R, Zel32f, Zel32f)
ZELI_PYR_LAYER(32f_C3R, Zel32f, Zel32f)
#undef ZELI_PYR_LAYER

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_PYRAMID_H */
