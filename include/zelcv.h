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

/* ---- Separable filter pipeline ----------------------------------------- */

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
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxBorderReplicate_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMinBorderReplicate_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliSize maskSize, ZeliPoint anchor, Zel8u* buffer);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_8u_C1R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_8u_C3R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_8u_C4R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_32f_C1R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_32f_C3R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMaxGetBufferSize_32f_C4R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_8u_C1R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_8u_C3R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_8u_C4R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_32f_C1R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_32f_C3R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliFilterMinGetBufferSize_32f_C4R(int roiWidth, ZeliSize maskSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyGetSize_8u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_8u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_8u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_8u_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_8u_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_8u_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_8u_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_8u_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_8u_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_32f_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_32f_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_32f_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_32f_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_32f_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_32f_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliMorphologyGetSize_32f_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus zeliMorphologyInit_32f_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyInitAlloc_32f_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor, ZeliMorphState** stateOut);
ZELCV_API ZelStatus zeliDilateBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliDilateBorderReplicate_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliErodeBorderReplicate_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphState* state);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_8u_C1R(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_8u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_8u_C3R(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_8u_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_8u_C4R(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_8u_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_32f_C1R(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_32f_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_32f_C3R(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_32f_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_32f_C4R(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_32f_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_16u_C1R(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_16u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_16s_C1R(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_16s_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliMorphologyBorderGetSize_1u_C1R(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus zeliMorphologyBorderInit_1u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize, ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, Zel8u borderValue, const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, const Zel8u borderValue[3], const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, const Zel8u borderValue[4], const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, Zel32f borderValue, const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, const Zel32f borderValue[3], const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, const Zel32f borderValue[4], const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, Zel16u borderValue, const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, Zel16s borderValue, const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliDilateBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset, Zel8u* dst, int dstStep, int dstBitOffset, ZeliSize roiSize, ZeliBorderType borderType, Zel8u borderValue, const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, Zel8u borderValue, const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, const Zel8u borderValue[3], const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, const Zel8u borderValue[4], const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, Zel32f borderValue, const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, const Zel32f borderValue[3], const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, const Zel32f borderValue[4], const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, Zel16u borderValue, const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst, int dstStep, ZeliSize roiSize, ZeliBorderType borderType, Zel16s borderValue, const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus zeliErodeBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset, Zel8u* dst, int dstStep, int dstBitOffset, ZeliSize roiSize, ZeliBorderType borderType, Zel8u borderValue, const ZeliMorphState* state, Zel8u* buffer);

/* ---- Integral images and rectangle statistics -------------------------- */

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_H */
