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
 * all four flags. Each operation documents which kinds it accepts. */
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

/* ---- Integral images and rectangle statistics -------------------------- */

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_H */
