/* zelcv: computer-vision image primitives with a C interface.
 *
 * Images belong to the caller and are passed as a pointer to the first pixel
 * of the region of interest (ROI), a row step in bytes and the ROI size.
 * Every function returns a ZelStatus: 0 on success, a negative error code
 * (nothing was written) or a positive warning. Nothing is thrown or logged and
 * the library keeps no global state.
 */
#ifndef ZELCV_H
#define ZELCV_H

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#if defined(_WIN32)
#  define ZELCV_API __declspec(dllimport)
#elif defined(__GNUC__)
#  define ZELCV_API __attribute__((visibility("default")))
#else
#  define ZELCV_API
#endif

/* ---- Element types ---------------------------------------------------- */
typedef uint8_t  Zel8u;
typedef int8_t   Zel8s;
typedef uint16_t Zel16u;
typedef int16_t  Zel16s;
typedef int32_t  Zel32s;
typedef float    Zel32f;
typedef double   Zel64f;

/* Element-type codes taken by queries and states that are not typed by name. */
typedef int32_t ZelDataType;
enum {
  zel8u = 1,
  zel8s = 3,
  zel16u = 5,
  zel16s = 7,
  zel32f = 13,
  zel64f = 19
};

/* ---- Geometry --------------------------------------------------------- */
typedef struct { int32_t width, height; } ZeliSize;
typedef struct { int32_t x, y; } ZeliPoint;
typedef struct { int32_t x, y, width, height; } ZeliRect;
typedef struct { Zel32f x, y; } ZeliPoint_32f;

/* ---- Status codes ----------------------------------------------------- */
/* 0 success, negative: error (nothing visible was done), positive: warning.
 * The first failing check decides the code. Checks run in this order: null
 * pointers (-8), ROI size (-6), each step against its row bytes (-14), step
 * alignment of 16- and 32-bit images (-108), then the operation's own checks. */
typedef int32_t ZelStatus;
enum {
  zelStatusOk = 0,
  zelStatusDivByZero = 6,
  zelStatusOutputFull = 33,
  zelStatusNoWork = 48,
  zelStatusBadArgument = -5,
  zelStatusBadSize = -6,
  zelStatusBadRange = -7,
  zelStatusNullPointer = -8,
  zelStatusOutOfMemory = -9,
  zelStatusOutOfRange = -11,
  zelStatusBadDataType = -12,
  zelStatusBadStep = -14,
  zelStatusBadContext = -17,
  zelStatusBadSelector = -18,
  zelStatusBadMaskSize = -33,
  zelStatusBadAnchor = -34,
  zelStatusChannelCountNotSupported = -47,
  zelStatusBadChannelOfInterest = -52,
  zelStatusBadChannels = -53,
  zelStatusBadMetrics = -56,
  zelStatusMisalignedStep = -108,
  zelStatusBadBorder = -225,
  zelStatusBadNormType = -229,
  zelStatusBadFilterType = -230,
  zelStatusInPlaceNotSupported = -9997
};

/* ---- Border types ------------------------------------------------------ */
/* Low four bits: the kind of border. Bits 4..7: per-side flags saying that
 * the pixels beyond that side exist in memory and are read from there; a flag
 * overrides the kind on its side only, and zelBorderInMemory is the same as
 * all four flags. Each operation documents which kinds it accepts, and
 * validates only the kind (value & 0x0F) when it accepts flags.
 * Mirror kinds on a row shorter than the reach of a kernel keep reflecting
 * between the two ends; on a row of width 1 both mirror kinds repeat pixel 0.
 * Kind 5 is not a border kind. A constant border of a multi-channel image
 * takes one value per channel. */
typedef int32_t ZeliBorderType;
enum {
  zelBorderConstant = 0,       /* the caller's border value */
  zelBorderReplicate = 1,      /* the edge pixel repeated */
  zelBorderWrap = 2,           /* periodic continuation */
  zelBorderMirror = 3,         /* reflection about the edge pixel: -1 -> 1 */
  zelBorderMirrorWithEdge = 4, /* reflection repeating the edge: -1 -> 0 */
  zelBorderInMemory = 6,       /* all four sides read from memory */
  zelBorderInMemTop = 0x10,
  zelBorderInMemBottom = 0x20,
  zelBorderInMemLeft = 0x40,
  zelBorderInMemRight = 0x80
};

/* ---- Version ----------------------------------------------------------- */
typedef struct {
  int32_t major;
  int32_t minor;
  int32_t majorBuild;
  int32_t build;
  char targetCpu[4];     /* NUL-padded */
  const char* name;
  const char* version;
  const char* buildDate;
} ZelLibraryVersion;

/* Returns the library's static version record (same pointer on every call;
 * never freed). */
ZELCV_API const ZelLibraryVersion* zelcvGetLibVersion(void);

/* ---- State objects ------------------------------------------------------ */
/* Opaque states. An object made by an InitAlloc function is released by the
 * matching Free function; Free(NULL) returns zelStatusNullPointer. */
typedef struct ZeliMorphState ZeliMorphState;
typedef struct ZeliMorphAdvState ZeliMorphAdvState;
typedef struct ZeliPyramid ZeliPyramid;
typedef struct ZeliPyramidLayerState ZeliPyramidLayerState;
typedef struct ZeliInpaintState ZeliInpaintState;

ZELCV_API ZelStatus zeliMorphologyFree(ZeliMorphState* state);
ZELCV_API ZelStatus zeliPyramidFree(ZeliPyramid* pyramid);
ZELCV_API ZelStatus zeliInpaintFree_8u_C1R(ZeliInpaintState* state);
ZELCV_API ZelStatus zeliInpaintFree_8u_C3R(ZeliInpaintState* state);
ZELCV_API ZelStatus zeliPyramidLayerDownFree_8u_C1R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerDownFree_8u_C3R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerDownFree_16u_C1R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerDownFree_16u_C3R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerDownFree_32f_C1R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerDownFree_32f_C3R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerUpFree_8u_C1R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerUpFree_8u_C3R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerUpFree_16u_C1R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerUpFree_16u_C3R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerUpFree_32f_C1R(ZeliPyramidLayerState* state);
ZELCV_API ZelStatus zeliPyramidLayerUpFree_32f_C3R(ZeliPyramidLayerState* state);

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
ZELCV_API ZelStatus zeliAdd_8u32f_C1IR(const Zel8u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAdd_8s32f_C1IR(const Zel8s* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAdd_16u32f_C1IR(const Zel16u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAdd_8u32f_C1IMR(const Zel8u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAdd_8s32f_C1IMR(const Zel8s* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAdd_16u32f_C1IMR(const Zel16u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAdd_32f_C1IMR(const Zel32f* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);

ZELCV_API ZelStatus zeliAddSquare_8u32f_C1IR(const Zel8u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddSquare_8s32f_C1IR(const Zel8s* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddSquare_16u32f_C1IR(const Zel16u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddSquare_32f_C1IR(const Zel32f* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddSquare_8u32f_C1IMR(const Zel8u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddSquare_8s32f_C1IMR(const Zel8s* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddSquare_16u32f_C1IMR(const Zel16u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddSquare_32f_C1IMR(const Zel32f* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);

ZELCV_API ZelStatus zeliAddProduct_8u32f_C1IR(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddProduct_8s32f_C1IR(const Zel8s* src1, int src1Step, const Zel8s* src2, int src2Step, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddProduct_16u32f_C1IR(const Zel16u* src1, int src1Step, const Zel16u* src2, int src2Step, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddProduct_32f_C1IR(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddProduct_8u32f_C1IMR(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddProduct_8s32f_C1IMR(const Zel8s* src1, int src1Step, const Zel8s* src2, int src2Step, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddProduct_16u32f_C1IMR(const Zel16u* src1, int src1Step, const Zel16u* src2, int src2Step, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAddProduct_32f_C1IMR(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize);

ZELCV_API ZelStatus zeliAddWeighted_8u32f_C1IR(const Zel8u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus zeliAddWeighted_8s32f_C1IR(const Zel8s* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus zeliAddWeighted_16u32f_C1IR(const Zel16u* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus zeliAddWeighted_32f_C1IR(const Zel32f* src, int srcStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus zeliAddWeighted_8u32f_C1IMR(const Zel8u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus zeliAddWeighted_8s32f_C1IMR(const Zel8s* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus zeliAddWeighted_16u32f_C1IMR(const Zel16u* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus zeliAddWeighted_32f_C1IMR(const Zel32f* src, int srcStep, const Zel8u* mask, int maskStep, Zel32f* srcDst, int srcDstStep, ZeliSize roiSize, Zel32f alpha);
ZELCV_API ZelStatus zeliAddWeighted_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step, Zel32f* dst, int dstStep, ZeliSize roiSize, Zel32f alpha);

ZELCV_API ZelStatus zeliAbsDiff_8u_C1R(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, Zel8u* dst, int dstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAbsDiff_8u_C3R(const Zel8u* src1, int src1Step, const Zel8u* src2, int src2Step, Zel8u* dst, int dstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAbsDiff_16u_C1R(const Zel16u* src1, int src1Step, const Zel16u* src2, int src2Step, Zel16u* dst, int dstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAbsDiff_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2, int src2Step, Zel32f* dst, int dstStep, ZeliSize roiSize);
ZELCV_API ZelStatus zeliAbsDiffC_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, int value);
ZELCV_API ZelStatus zeliAbsDiffC_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst, int dstStep, ZeliSize roiSize, int value);
ZELCV_API ZelStatus zeliAbsDiffC_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, Zel32f value);

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
  ZELCV_API ZelStatus zeliFilterRowBorderPipeline_##suffix(                                   \
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
ZELCV_API ZelStatus zeliFilterRowBorderPipeline_32f_C1R(
    const Zel32f* src, int srcStep, Zel32f** dst, ZeliSize roiSize, const Zel32f* kernel,
    int kernelSize, int xAnchor, ZeliBorderType borderType, Zel32f borderValue, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterRowBorderPipeline_32f_C3R(
    const Zel32f* src, int srcStep, Zel32f** dst, ZeliSize roiSize, const Zel32f* kernel,
    int kernelSize, int xAnchor, ZeliBorderType borderType, const Zel32f* borderValue,
    Zel8u* buffer);

#define ZELI_COLUMN_PIPELINE(suffix, S, D, Tap)                                             \
  ZELCV_API ZelStatus zeliFilterColumnPipeline_##suffix(const S** src, D* dst, int dstStep, \
                                                        ZeliSize roiSize, const Tap* kernel, \
                                                        int kernelSize, int divisor, Zel8u* buffer);
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
ZELCV_API ZelStatus zeliFilterColumnPipeline_32f_C1R(const Zel32f** src, Zel32f* dst, int dstStep,
                                                     ZeliSize roiSize, const Zel32f* kernel,
                                                     int kernelSize, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterColumnPipeline_32f_C3R(const Zel32f** src, Zel32f* dst, int dstStep,
                                                     ZeliSize roiSize, const Zel32f* kernel,
                                                     int kernelSize, Zel8u* buffer);

/* Work-buffer sizes: the row sizes depend on kernelSize only, the column
 * sizes on the width only. */
#define ZELI_PIPELINE_QUERY(name) \
  ZELCV_API ZelStatus name(ZeliSize roiSize, int kernelSize, int* bufferSize);
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

/* ---- Canny edge detector ----------------------------------------------- */
/* Edge map: 255 on edge pixels, 0 elsewhere. The magnitude is thinned along
 * the quantised gradient direction (a plateau across an edge keeps its
 * first pixel, leftmost or topmost); candidates above the low threshold join
 * the edges 8-connected to a pixel strictly above the high threshold.
 * Thresholds: 0 <= low <= high, else zelStatusBadArgument (also for NaN).
 * A size whose work buffer would exceed INT_MAX bytes gives zelStatusBadSize
 * from the queries and the operations alike. */
enum { zelFilterSobel = 2, zelFilterScharr = 5 };    /* derivative kernel kinds */
enum { zelMaskSize3x3 = 33, zelMaskSize5x5 = 55 };
enum { zelNormL1 = 2, zelNormL2 = 4 };                /* |dx| + |dy|; sqrt(dx^2 + dy^2) */

/* Work buffer bytes for zeliCanny_16s8u_C1R and zeliCanny_32f8u_C1R. */
ZELCV_API ZelStatus zeliCannyGetSize(ZeliSize roiSize, int* bufferSize);
/* Work buffer bytes for zeliCannyBorder_8u_C1R; filterType and norm are not
 * examined. */
ZELCV_API ZelStatus zeliCannyBorderGetSize(ZeliSize roiSize, int filterType, int mask, int norm,
                                           int* bufferSize);
/* From precomputed derivatives; magnitude |dx| + |dy|, kept when >= low. */
ZELCV_API ZelStatus zeliCanny_16s8u_C1R(const Zel16s* srcDx, int srcDxStep, const Zel16s* srcDy,
                                        int srcDyStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                        Zel32f lowThreshold, Zel32f highThreshold, Zel8u* buffer);
ZELCV_API ZelStatus zeliCanny_32f8u_C1R(const Zel32f* srcDx, int srcDxStep, const Zel32f* srcDy,
                                        int srcDyStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                        Zel32f lowThreshold, Zel32f highThreshold, Zel8u* buffer);
/* From an 8-bit image: 3x3 Sobel or Scharr, or 5x5 Sobel derivatives with
 * borders zelBorderConstant (borderValue), zelBorderReplicate or
 * zelBorderInMemory / the in-memory side flags (a pixel outside both a row
 * and a column end follows the vertical rule, then the horizontal one); the
 * norm is zelNormL1 or zelNormL2 (double precision); a magnitude is kept only
 * when > low. Checks: mask size (-33) before the pointers (-8), then size
 * (-6), steps (-14), filter/norm/thresholds (-5), border kind (-225). */
ZELCV_API ZelStatus zeliCannyBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                           ZeliSize roiSize, int filterType, int mask,
                                           ZeliBorderType borderType, Zel8u borderValue,
                                           Zel32f lowThreshold, Zel32f highThreshold, int norm,
                                           Zel8u* buffer);

/* ---- Flat morphology: min/max filters, dilation, erosion -------------- */
/* The element (mask) is maskSize.width x maskSize.height bytes without row
 * padding; non-zero bytes are on. Dilation writes the maximum over the on
 * elements placed with the anchor on the output pixel, erosion the minimum.
 * 32f: -0.0 and +0.0 compare equal and either may be returned; NaN inputs
 * give unspecified results.
 *
 * Max/Min filters: solid rectangle, replicated border; buffer of the size
 * the matching GetBufferSize reports (Min and Max share one size rule).
 * Older interface: MorphologyInit/InitAlloc (caller's anchor) builds a state
 * that also holds the work memory; DilateBorderReplicate/ErodeBorderReplicate
 * accept borderType 1 only (-5 otherwise). A state of the older interface
 * must not serve two calls at once.
 * Newer interface: MorphologyBorderInit (centre anchor) into caller memory,
 * plus a separate work buffer per call; DilateBorder/ErodeBorder accept
 * zelBorderReplicate with any in-memory side flags, or zelBorderInMemory;
 * borderValue is never read. BorderInit does not use its buffer argument (it
 * may be null). 8u and 32f accept src == dst (the same image and step);
 * other overlaps are not supported. 16u, 16s and 1u refuse src == dst (-9997).
 * States are placed at the start of the caller's block at any alignment;
 * copying a built state elsewhere is not supported. Sizes that do not fit in
 * 32 bits give zelStatusBadSize.
 * 1u images: pixels are bits, the pixel at bit offset 0 is the most
 * significant bit of its byte; a bit offset of 8 or more advances the row
 * pointer by whole bytes. Bits of the destination bytes outside the ROI are
 * kept. Dilation is OR, erosion AND over the on elements. */
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliSize maskSize, ZeliPoint anchor,
                                                        Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliSize maskSize, ZeliPoint anchor,
                                                        Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliSize maskSize, ZeliPoint anchor,
                                                        Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_32f_C1R(const Zel32f* src, int srcStep,
                                                         Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                         ZeliSize maskSize, ZeliPoint anchor,
                                                         Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_32f_C3R(const Zel32f* src, int srcStep,
                                                         Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                         ZeliSize maskSize, ZeliPoint anchor,
                                                         Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_32f_C4R(const Zel32f* src, int srcStep,
                                                         Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                         ZeliSize maskSize, ZeliPoint anchor,
                                                         Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliSize maskSize, ZeliPoint anchor,
                                                        Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliSize maskSize, ZeliPoint anchor,
                                                        Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliSize maskSize, ZeliPoint anchor,
                                                        Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_32f_C1R(const Zel32f* src, int srcStep,
                                                         Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                         ZeliSize maskSize, ZeliPoint anchor,
                                                         Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_32f_C3R(const Zel32f* src, int srcStep,
                                                         Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                         ZeliSize maskSize, ZeliPoint anchor,
                                                         Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_32f_C4R(const Zel32f* src, int srcStep,
                                                         Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                         ZeliSize maskSize, ZeliPoint anchor,
                                                         Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_8u_C1R(int roiWidth, ZeliSize maskSize,
                                                      int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_8u_C3R(int roiWidth, ZeliSize maskSize,
                                                      int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_8u_C4R(int roiWidth, ZeliSize maskSize,
                                                      int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_32f_C1R(int roiWidth, ZeliSize maskSize,
                                                       int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_32f_C3R(int roiWidth, ZeliSize maskSize,
                                                       int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_32f_C4R(int roiWidth, ZeliSize maskSize,
                                                       int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_8u_C1R(int roiWidth, ZeliSize maskSize,
                                                      int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_8u_C3R(int roiWidth, ZeliSize maskSize,
                                                      int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_8u_C4R(int roiWidth, ZeliSize maskSize,
                                                      int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_32f_C1R(int roiWidth, ZeliSize maskSize,
                                                       int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_32f_C3R(int roiWidth, ZeliSize maskSize,
                                                       int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_32f_C4R(int roiWidth, ZeliSize maskSize,
                                                       int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyGetSize_8u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                 int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_8u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                              ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_8u_C1R(int roiWidth, const Zel8u* mask,
                                                   ZeliSize maskSize, ZeliPoint anchor,
                                                   ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_8u_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                 int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_8u_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                              ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_8u_C3R(int roiWidth, const Zel8u* mask,
                                                   ZeliSize maskSize, ZeliPoint anchor,
                                                   ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_8u_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                 int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_8u_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                              ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_8u_C4R(int roiWidth, const Zel8u* mask,
                                                   ZeliSize maskSize, ZeliPoint anchor,
                                                   ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_32f_C1R(int roiWidth, const Zel8u* mask,
                                                  ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_32f_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                               ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_32f_C1R(int roiWidth, const Zel8u* mask,
                                                    ZeliSize maskSize, ZeliPoint anchor,
                                                    ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_32f_C3R(int roiWidth, const Zel8u* mask,
                                                  ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_32f_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                               ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_32f_C3R(int roiWidth, const Zel8u* mask,
                                                    ZeliSize maskSize, ZeliPoint anchor,
                                                    ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_32f_C4R(int roiWidth, const Zel8u* mask,
                                                  ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_32f_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                               ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_32f_C4R(int roiWidth, const Zel8u* mask,
                                                    ZeliSize maskSize, ZeliPoint anchor,
                                                    ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliDilateBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                     int dstStep, ZeliSize roiSize,
                                                     ZeliBorderType borderType,
                                                     ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                     int dstStep, ZeliSize roiSize,
                                                     ZeliBorderType borderType,
                                                     ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                     int dstStep, ZeliSize roiSize,
                                                     ZeliBorderType borderType,
                                                     ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                      int dstStep, ZeliSize roiSize,
                                                      ZeliBorderType borderType,
                                                      ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                      int dstStep, ZeliSize roiSize,
                                                      ZeliBorderType borderType,
                                                      ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                      int dstStep, ZeliSize roiSize,
                                                      ZeliBorderType borderType,
                                                      ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType,
                                                    ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType,
                                                    ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType,
                                                    ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                     int dstStep, ZeliSize roiSize,
                                                     ZeliBorderType borderType,
                                                     ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                     int dstStep, ZeliSize roiSize,
                                                     ZeliBorderType borderType,
                                                     ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                     int dstStep, ZeliSize roiSize,
                                                     ZeliBorderType borderType,
                                                     ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_8u_C1R(int roiWidth, ZeliSize maskSize,
                                                       int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_8u_C1R(int roiWidth, const Zel8u* mask,
                                                    ZeliSize maskSize, ZeliMorphState* state,
                                                    Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_8u_C3R(int roiWidth, ZeliSize maskSize,
                                                       int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_8u_C3R(int roiWidth, const Zel8u* mask,
                                                    ZeliSize maskSize, ZeliMorphState* state,
                                                    Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_8u_C4R(int roiWidth, ZeliSize maskSize,
                                                       int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_8u_C4R(int roiWidth, const Zel8u* mask,
                                                    ZeliSize maskSize, ZeliMorphState* state,
                                                    Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_32f_C1R(int roiWidth, ZeliSize maskSize,
                                                        int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_32f_C1R(int roiWidth, const Zel8u* mask,
                                                     ZeliSize maskSize, ZeliMorphState* state,
                                                     Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_32f_C3R(int roiWidth, ZeliSize maskSize,
                                                        int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_32f_C3R(int roiWidth, const Zel8u* mask,
                                                     ZeliSize maskSize, ZeliMorphState* state,
                                                     Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_32f_C4R(int roiWidth, ZeliSize maskSize,
                                                        int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_32f_C4R(int roiWidth, const Zel8u* mask,
                                                     ZeliSize maskSize, ZeliMorphState* state,
                                                     Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_16u_C1R(int roiWidth, ZeliSize maskSize,
                                                        int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_16u_C1R(int roiWidth, const Zel8u* mask,
                                                     ZeliSize maskSize, ZeliMorphState* state,
                                                     Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_16s_C1R(int roiWidth, ZeliSize maskSize,
                                                        int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_16s_C1R(int roiWidth, const Zel8u* mask,
                                                     ZeliSize maskSize, ZeliMorphState* state,
                                                     Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_1u_C1R(int roiWidth, ZeliSize maskSize,
                                                       int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_1u_C1R(int roiWidth, const Zel8u* mask,
                                                    ZeliSize maskSize, ZeliMorphState* state,
                                                    Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                            ZeliSize roiSize, ZeliBorderType borderType,
                                            Zel8u borderValue, const ZeliMorphState* state,
                                            Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                            ZeliSize roiSize, ZeliBorderType borderType,
                                            const Zel8u borderValue[3], const ZeliMorphState* state,
                                            Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                            ZeliSize roiSize, ZeliBorderType borderType,
                                            const Zel8u borderValue[4], const ZeliMorphState* state,
                                            Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                             int dstStep, ZeliSize roiSize,
                                             ZeliBorderType borderType, Zel32f borderValue,
                                             const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                             int dstStep, ZeliSize roiSize,
                                             ZeliBorderType borderType, const Zel32f borderValue[3],
                                             const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                             int dstStep, ZeliSize roiSize,
                                             ZeliBorderType borderType, const Zel32f borderValue[4],
                                             const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                             int dstStep, ZeliSize roiSize,
                                             ZeliBorderType borderType, Zel16u borderValue,
                                             const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                             int dstStep, ZeliSize roiSize,
                                             ZeliBorderType borderType, Zel16s borderValue,
                                             const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                            Zel8u* dst, int dstStep, int dstBitOffset,
                                            ZeliSize roiSize, ZeliBorderType borderType,
                                            Zel8u borderValue, const ZeliMorphState* state,
                                            Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                           ZeliSize roiSize, ZeliBorderType borderType,
                                           Zel8u borderValue, const ZeliMorphState* state,
                                           Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                           ZeliSize roiSize, ZeliBorderType borderType,
                                           const Zel8u borderValue[3], const ZeliMorphState* state,
                                           Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                           ZeliSize roiSize, ZeliBorderType borderType,
                                           const Zel8u borderValue[4], const ZeliMorphState* state,
                                           Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                            int dstStep, ZeliSize roiSize,
                                            ZeliBorderType borderType, Zel32f borderValue,
                                            const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                            int dstStep, ZeliSize roiSize,
                                            ZeliBorderType borderType, const Zel32f borderValue[3],
                                            const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                            int dstStep, ZeliSize roiSize,
                                            ZeliBorderType borderType, const Zel32f borderValue[4],
                                            const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                            int dstStep, ZeliSize roiSize,
                                            ZeliBorderType borderType, Zel16u borderValue,
                                            const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                            int dstStep, ZeliSize roiSize,
                                            ZeliBorderType borderType, Zel16s borderValue,
                                            const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                           Zel8u* dst, int dstStep, int dstBitOffset,
                                           ZeliSize roiSize, ZeliBorderType borderType,
                                           Zel8u borderValue, const ZeliMorphState* state,
                                           Zel8u* buffer);

/* ---- Compound morphology: opening, closing, top-hat, black-hat, gradient - */
/* Compositions of the newer dilation/erosion above with the mask of Init and
 * its reflection through the centre. MorphAdvGetSize: stateSize = 2 S + 32,
 * bufferSize = R (h + mh - 1) + 2 B, S and B the MorphologyBorderGetSize sizes
 * for roiSize.width, R the bytes of a row widened by mw - 1 pixels rounded up
 * to 32 (1u: one byte per pixel). MorphAdvInit reflects the caller's mask in
 * place and restores it before returning (the mask must be writable); the
 * state keeps a pointer into the buffer given to Init (the gradient's
 * intermediate image), so that buffer must stay valid while the state is
 * used, and a gradient call must not run concurrently with another call
 * passing that same buffer. MorphAdvInitAlloc takes the caller's anchor for the
 * mask (the reflected anchor for the reflection); its state is released by
 * MorphAdvFree. Processing calls accept zelBorderReplicate with any in-memory
 * side flags or zelBorderInMemory (which reads mh - 1 rows and mw - 1 columns
 * around the ROI); borderValue is never read. An ROI wider than the Init
 * width, or one whose intermediate image does not fit the Init size, gives
 * -6. Opening and closing accept src == dst; top-hat, black-hat and gradient
 * refuse it (-9997); other overlaps are not supported.
 * Top-hat is src - opening, black-hat closing - src, gradient dilation -
 * erosion: saturating at 0 for 8u and 16u, to the 16-bit range for 16s, and
 * for 32f a float subtraction clamped below at 0 (NaN gives 0). 1u: pixels as
 * in flat morphology; a difference pixel is set where the first operand is set
 * and the second is clear. */
ZELCV_API ZelStatus zeliMorphAdvFree(ZeliMorphAdvState* state);
ZELCV_API ZelStatus zeliMorphAdvGetSize_8u_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                               int* bufferSize);
ZELCV_API ZelStatus zeliMorphAdvInit_8u_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                            ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvInitAlloc_8u_C1R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                 Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus zeliMorphOpenBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                               int dstStep, ZeliSize roiSize,
                                               ZeliBorderType borderType, Zel8u borderValue,
                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphCloseBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                int dstStep, ZeliSize roiSize,
                                                ZeliBorderType borderType, Zel8u borderValue,
                                                const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphTophatBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                 int dstStep, ZeliSize roiSize,
                                                 ZeliBorderType borderType, Zel8u borderValue,
                                                 const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphBlackhatBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                   int dstStep, ZeliSize roiSize,
                                                   ZeliBorderType borderType, Zel8u borderValue,
                                                   const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphGradientBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                   int dstStep, ZeliSize roiSize,
                                                   ZeliBorderType borderType, Zel8u borderValue,
                                                   const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvGetSize_8u_C3R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                               int* bufferSize);
ZELCV_API ZelStatus zeliMorphAdvInit_8u_C3R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                            ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvInitAlloc_8u_C3R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                 Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus zeliMorphOpenBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                               int dstStep, ZeliSize roiSize,
                                               ZeliBorderType borderType,
                                               const Zel8u borderValue[3],
                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphCloseBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                int dstStep, ZeliSize roiSize,
                                                ZeliBorderType borderType,
                                                const Zel8u borderValue[3],
                                                const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphTophatBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                 int dstStep, ZeliSize roiSize,
                                                 ZeliBorderType borderType,
                                                 const Zel8u borderValue[3],
                                                 const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphBlackhatBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                   int dstStep, ZeliSize roiSize,
                                                   ZeliBorderType borderType,
                                                   const Zel8u borderValue[3],
                                                   const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphGradientBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                   int dstStep, ZeliSize roiSize,
                                                   ZeliBorderType borderType,
                                                   const Zel8u borderValue[3],
                                                   const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvGetSize_8u_C4R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                               int* bufferSize);
ZELCV_API ZelStatus zeliMorphAdvInit_8u_C4R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                            ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvInitAlloc_8u_C4R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                 Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus zeliMorphOpenBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                               int dstStep, ZeliSize roiSize,
                                               ZeliBorderType borderType,
                                               const Zel8u borderValue[4],
                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphCloseBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                int dstStep, ZeliSize roiSize,
                                                ZeliBorderType borderType,
                                                const Zel8u borderValue[4],
                                                const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphTophatBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                 int dstStep, ZeliSize roiSize,
                                                 ZeliBorderType borderType,
                                                 const Zel8u borderValue[4],
                                                 const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphBlackhatBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                   int dstStep, ZeliSize roiSize,
                                                   ZeliBorderType borderType,
                                                   const Zel8u borderValue[4],
                                                   const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphGradientBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                   int dstStep, ZeliSize roiSize,
                                                   ZeliBorderType borderType,
                                                   const Zel8u borderValue[4],
                                                   const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvGetSize_32f_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                int* bufferSize);
ZELCV_API ZelStatus zeliMorphAdvInit_32f_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                             ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvInitAlloc_32f_C1R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                  Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus zeliMorphOpenBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                int dstStep, ZeliSize roiSize,
                                                ZeliBorderType borderType, Zel32f borderValue,
                                                const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphCloseBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                 int dstStep, ZeliSize roiSize,
                                                 ZeliBorderType borderType, Zel32f borderValue,
                                                 const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphTophatBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                  int dstStep, ZeliSize roiSize,
                                                  ZeliBorderType borderType, Zel32f borderValue,
                                                  const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphBlackhatBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType, Zel32f borderValue,
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphGradientBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType, Zel32f borderValue,
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvGetSize_32f_C3R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                int* bufferSize);
ZELCV_API ZelStatus zeliMorphAdvInit_32f_C3R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                             ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvInitAlloc_32f_C3R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                  Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus zeliMorphOpenBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                int dstStep, ZeliSize roiSize,
                                                ZeliBorderType borderType,
                                                const Zel32f borderValue[3],
                                                const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphCloseBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                 int dstStep, ZeliSize roiSize,
                                                 ZeliBorderType borderType,
                                                 const Zel32f borderValue[3],
                                                 const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphTophatBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                  int dstStep, ZeliSize roiSize,
                                                  ZeliBorderType borderType,
                                                  const Zel32f borderValue[3],
                                                  const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphBlackhatBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType,
                                                    const Zel32f borderValue[3],
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphGradientBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType,
                                                    const Zel32f borderValue[3],
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvGetSize_32f_C4R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                int* bufferSize);
ZELCV_API ZelStatus zeliMorphAdvInit_32f_C4R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                             ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvInitAlloc_32f_C4R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                  Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus zeliMorphOpenBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                int dstStep, ZeliSize roiSize,
                                                ZeliBorderType borderType,
                                                const Zel32f borderValue[4],
                                                const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphCloseBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                 int dstStep, ZeliSize roiSize,
                                                 ZeliBorderType borderType,
                                                 const Zel32f borderValue[4],
                                                 const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphTophatBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                  int dstStep, ZeliSize roiSize,
                                                  ZeliBorderType borderType,
                                                  const Zel32f borderValue[4],
                                                  const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphBlackhatBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType,
                                                    const Zel32f borderValue[4],
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphGradientBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType,
                                                    const Zel32f borderValue[4],
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvGetSize_16u_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                int* bufferSize);
ZELCV_API ZelStatus zeliMorphAdvInit_16u_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                             ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphOpenBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                int dstStep, ZeliSize roiSize,
                                                ZeliBorderType borderType, Zel16u borderValue,
                                                const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphCloseBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                 int dstStep, ZeliSize roiSize,
                                                 ZeliBorderType borderType, Zel16u borderValue,
                                                 const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphTophatBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                  int dstStep, ZeliSize roiSize,
                                                  ZeliBorderType borderType, Zel16u borderValue,
                                                  const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphBlackhatBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType, Zel16u borderValue,
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphGradientBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType, Zel16u borderValue,
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvGetSize_16s_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                int* bufferSize);
ZELCV_API ZelStatus zeliMorphAdvInit_16s_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                             ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphOpenBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                int dstStep, ZeliSize roiSize,
                                                ZeliBorderType borderType, Zel16s borderValue,
                                                const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphCloseBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                 int dstStep, ZeliSize roiSize,
                                                 ZeliBorderType borderType, Zel16s borderValue,
                                                 const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphTophatBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                  int dstStep, ZeliSize roiSize,
                                                  ZeliBorderType borderType, Zel16s borderValue,
                                                  const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphBlackhatBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType, Zel16s borderValue,
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphGradientBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                    int dstStep, ZeliSize roiSize,
                                                    ZeliBorderType borderType, Zel16s borderValue,
                                                    const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphAdvGetSize_1u_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                               int* bufferSize);
ZELCV_API ZelStatus zeliMorphAdvInit_1u_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                            ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphOpenBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                               Zel8u* dst, int dstStep, int dstBitOffset,
                                               ZeliSize roiSize, ZeliBorderType borderType,
                                               Zel8u borderValue, const ZeliMorphAdvState* state,
                                               Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphCloseBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                Zel8u* dst, int dstStep, int dstBitOffset,
                                                ZeliSize roiSize, ZeliBorderType borderType,
                                                Zel8u borderValue, const ZeliMorphAdvState* state,
                                                Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphTophatBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                 Zel8u* dst, int dstStep, int dstBitOffset,
                                                 ZeliSize roiSize, ZeliBorderType borderType,
                                                 Zel8u borderValue, const ZeliMorphAdvState* state,
                                                 Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphBlackhatBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                   Zel8u* dst, int dstStep, int dstBitOffset,
                                                   ZeliSize roiSize, ZeliBorderType borderType,
                                                   Zel8u borderValue,
                                                   const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphGradientBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                   Zel8u* dst, int dstStep, int dstBitOffset,
                                                   ZeliSize roiSize, ZeliBorderType borderType,
                                                   Zel8u borderValue,
                                                   const ZeliMorphAdvState* state, Zel8u* buffer);

/* ---- Integral images and rectangle statistics -------------------------- */
/* Integral images. For a w x h ROI the plain integral is (w + 1) x (h + 1):
 * row 0 and column 0 hold the start value val, and element (x + 1, y + 1)
 * holds val plus the sum of the source pixels in rows 0..y, columns 0..x.
 * SqrIntegral adds a second image of the same shape holding valSqr plus the
 * sum of the squared pixels. Each row is built from a running sum of the
 * source row (a 32-bit unsigned integer for 8u sources, converted once to the
 * output's floating type; single precision for 32f sources) added to the row
 * above. 32s outputs wrap modulo 2^32; they are never saturated.
 * Checks: null src, dst (or sqr) -8; w or h < 1 -6; srcStep < w x source
 * element size, dstStep (sqrStep) < (w + 1) x output element size -14; a
 * step of a 32- or 64-bit image not a multiple of its element size -108
 * (8u source steps are never tested for alignment). The tilted members check
 * the same way with w + 2 output columns. */
ZELCV_API ZelStatus zeliIntegral_8u32s_C1R(const Zel8u* src, int srcStep, Zel32s* dst, int dstStep,
                                           ZeliSize roiSize, Zel32s val);
ZELCV_API ZelStatus zeliIntegral_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst, int dstStep,
                                           ZeliSize roiSize, Zel32f val);
/* No start value: row 0 and column 0 are 0. */
ZELCV_API ZelStatus zeliIntegral_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                                         ZeliSize roiSize);
ZELCV_API ZelStatus zeliSqrIntegral_8u32s_C1R(const Zel8u* src, int srcStep, Zel32s* dst, int dstStep,
                                              Zel32s* sqr, int sqrStep, ZeliSize roiSize, Zel32s val,
                                              Zel32s valSqr);
ZELCV_API ZelStatus zeliSqrIntegral_8u32s64f_C1R(const Zel8u* src, int srcStep, Zel32s* dst,
                                                 int dstStep, Zel64f* sqr, int sqrStep,
                                                 ZeliSize roiSize, Zel32s val, Zel64f valSqr);
ZELCV_API ZelStatus zeliSqrIntegral_8u32f64f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                 int dstStep, Zel64f* sqr, int sqrStep,
                                                 ZeliSize roiSize, Zel32f val, Zel64f valSqr);

/* Tilted (45-degree) integrals: (w + 2) x (h + 2) outputs T, rows 0 and 1
 * holding val. For n >= 2, T[n][x] is val plus the sum of the source pixels
 * (r, c) with r <= n - 2 whose column lies in the upward cone
 * L = x - 1 - (n - 2 - r) <= c <= R = x + (n - 2 - r); the first column
 * (c = 0) is counted only when L <= 0 and L is even, the column just right of
 * the ROI (c = w) only when R >= w and R - w is even, other columns inside
 * the cone always. Each row n is built from rows n - 1 and n - 2:
 * T[n][x] = T[n-1][x-1] - T[n-2][x] + T[n-1][x+1] + src[n-2][x-1] + src[n-2][x],
 * T[n][0] = T[n-1][1], T[n][w+1] = T[n-1][w]. Floating sums are evaluated
 * left to right in double precision and rounded once to the output type.
 *
 * zeliTiltedIntegral_8u32f_C1R: the last column (x = w) of rows 2..h+1 adds
 * the value that the destination already held there (as if that value were
 * the pixel just right of the ROI); clear the destination first for a clean
 * result. zeliTiltedIntegral_8u32s_C1R never reads the destination nor
 * anything right of the ROI: its column w counts no pixel c = w. */
ZELCV_API ZelStatus zeliTiltedIntegral_8u32f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                 int dstStep, ZeliSize roiSize, Zel32f val);
ZELCV_API ZelStatus zeliTiltedIntegral_8u32s_C1R(const Zel8u* src, int srcStep, Zel32s* dst,
                                                 int dstStep, ZeliSize roiSize, Zel32s val);
/* Tilted sums and tilted squares, both (w + 2) x (h + 2). These read the
 * source pixel just right of the ROI in every row (src[y][w], counted as the
 * column c = w above): the caller must make it readable. The 32s planes wrap
 * modulo 2^32; 32f and 64f planes are evaluated in double precision
 * (T[n-1][x-1] - T[n-2][x] + T[n-1][x+1] + a + b, left to right, with a and b
 * the two pixels or their squares) and rounded once. Checks: null src, dst or
 * sqr -8; w or h < 1 -6; srcStep < w, dstStep < (w + 2) x element size of the
 * sums, sqrStep < (w + 2) x element size of the squares -14; a 32-bit step
 * not a multiple of 4 or a 64-bit step not a multiple of 8 -108. */
ZELCV_API ZelStatus zeliTiltedSqrIntegral_8u32s_C1R(const Zel8u* src, int srcStep, Zel32s* dst,
                                                    int dstStep, Zel32s* sqr, int sqrStep,
                                                    ZeliSize roiSize, Zel32s val, Zel32s valSqr);
ZELCV_API ZelStatus zeliTiltedSqrIntegral_8u32s64f_C1R(const Zel8u* src, int srcStep, Zel32s* dst,
                                                       int dstStep, Zel64f* sqr, int sqrStep,
                                                       ZeliSize roiSize, Zel32s val,
                                                       Zel64f valSqr);
ZELCV_API ZelStatus zeliTiltedSqrIntegral_8u32f64f_C1R(const Zel8u* src, int srcStep, Zel32f* dst,
                                                       int dstStep, Zel64f* sqr, int sqrStep,
                                                       ZeliSize roiSize, Zel32f val,
                                                       Zel64f valSqr);

/* Standard deviation over a sliding rectangle, from an integral (src) and a
 * squared integral (sqr). For each output pixel (x, y) of roiSize the
 * rectangle's corners in the integrals are TL = (x + rect.x, y + rect.y),
 * TR = TL + (rect.width, 0), BL = TL + (0, rect.height) and
 * BR = TL + (rect.width, rect.height); S = (I[TL] - I[TR]) + (I[BR] - I[BL])
 * and Q the same over the squares; with n the rectangle's pixel count,
 * mean = S / n and the result is sqrt(Q / n - mean^2), a negative variance
 * counting as 0. The integrals need w + rect.x + rect.width columns and
 * h + rect.y + rect.height rows.
 *   32f: S in single precision, Q in double; inv = 1 / n in double with n
 *   first converted to single precision; mean = S x inv and
 *   Q x inv - mean^2 in double, rounded to single precision; single square
 *   root.
 *   32s32f: as 32f, with S the exact 32-bit difference (wrapping, so that
 *   wrapped integrals still give the right sum) converted to double.
 *   32s_C1RSfs: both integrals 32s (as zeliSqrIntegral_8u32s_C1R makes them);
 *   S a signed and Q an unsigned 32-bit wrapping difference; the variance is
 *   (n x Q - S^2) / n^2 in double precision (so a constant area gives exactly
 *   0 while n x Q stays below 2^53); the double square root is multiplied by
 *   2^-scaleFactor, rounded to nearest (ties to even) and saturated to
 *   Zel32s. Any scaleFactor is accepted.
 * Checks, in this order: null src, sqr or dst -8; w or h < 1 -6;
 * srcStep < (w + rect.x + rect.width) x element size, dstStep < w x element
 * size or sqrStep < (w + rect.x + rect.width) x element size -14; a step not
 * a multiple of its element size -108; then rect.x < 0, rect.y < 0,
 * rect.width < 1 or rect.height < 1 -6 (the rectangle after the steps). */
ZELCV_API ZelStatus zeliRectStdDev_32f_C1R(const Zel32f* src, int srcStep, const Zel64f* sqr,
                                           int sqrStep, Zel32f* dst, int dstStep,
                                           ZeliSize roiSize, ZeliRect rect);
ZELCV_API ZelStatus zeliRectStdDev_32s32f_C1R(const Zel32s* src, int srcStep, const Zel64f* sqr,
                                              int sqrStep, Zel32f* dst, int dstStep,
                                              ZeliSize roiSize, ZeliRect rect);
ZELCV_API ZelStatus zeliRectStdDev_32s_C1RSfs(const Zel32s* src, int srcStep, const Zel32s* sqr,
                                              int sqrStep, Zel32s* dst, int dstStep,
                                              ZeliSize roiSize, ZeliRect rect, int scaleFactor);
/* The same over a tilted rectangle, from tilted integrals. (rect.x, rect.y)
 * is the rectangle's top corner in the integrals; rect.width runs down to the
 * right and rect.height down to the left, so the corners are
 * top = (x + rect.x, y + rect.y), right = top + (rect.width, rect.width),
 * left = top + (-rect.height, rect.height) and
 * bottom = top + (rect.width - rect.height, rect.width + rect.height), and
 * S = (T[top] - T[right]) + (T[bottom] - T[left]). In source pixels the
 * rectangle's top row is row y + rect.y, columns x + rect.x - 1 and
 * x + rect.x; with (tx, ty) = (x + rect.x, y + rect.y) it holds the pixels
 * (row r, column c) with tx - ty - 2 rect.height + 1 <= c - r <= tx - ty and
 * tx + ty - 1 <= c + r <= tx + ty + 2 rect.width - 2, n = 2 x rect.width x
 * rect.height pixels in rows ty .. ty + rect.width + rect.height - 2.
 * Arithmetic, argument kinds and checks
 * as the upright members, plus rect.x < rect.height -6 (the left corner would
 * lie left of column 0). The integrals need w + rect.x + rect.width columns
 * and h + rect.y + rect.width + rect.height rows. */
ZELCV_API ZelStatus zeliTiltedRectStdDev_32f_C1R(const Zel32f* src, int srcStep, const Zel64f* sqr,
                                                 int sqrStep, Zel32f* dst, int dstStep,
                                                 ZeliSize roiSize, ZeliRect rect);
ZELCV_API ZelStatus zeliTiltedRectStdDev_32s32f_C1R(const Zel32s* src, int srcStep,
                                                    const Zel64f* sqr, int sqrStep, Zel32f* dst,
                                                    int dstStep, ZeliSize roiSize, ZeliRect rect);
ZELCV_API ZelStatus zeliTiltedRectStdDev_32s_C1RSfs(const Zel32s* src, int srcStep,
                                                    const Zel32s* sqr, int sqrStep, Zel32s* dst,
                                                    int dstStep, ZeliSize roiSize, ZeliRect rect,
                                                    int scaleFactor);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_H */
