/* zelcv: the types, status codes, border kinds and version record that every
 * family's header uses, and the release routines several families share.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_BASE_H
#define ZELCV_BASE_H

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* On Windows a caller imports the functions from zelcv.dll. The library's
 * own sources define ZELCV_BUILDING_LIBRARY: its exports are assembler stubs
 * named by a .def file, and an import declaration there would make its
 * references go through an import table that the DLL does not have. */
#if defined(_WIN32) && !defined(ZELCV_BUILDING_LIBRARY)
#  define ZELCV_API __declspec(dllimport)
#elif defined(__GNUC__) && !defined(_WIN32)
#  define ZELCV_API __attribute__((visibility("default")))
#else
#  define ZELCV_API
#endif

/* The calling convention of every export, written between the result type
 * and the name, so that callers built with any default convention (/Gz,
 * -mrtd, ...) agree. It is __cdecl on Windows: the caller removes the
 * arguments, and a cdecl name carries no argument-size suffix, so that the
 * DLL exports the plain names and the import libraries that MinGW and MSVC
 * make from zelcv.def find them without aliases. On x86-64 there is only
 * one convention and the keyword is ignored. */
#if defined(_WIN32)
#  define ZELCV_CALL __cdecl
#else
#  define ZELCV_CALL
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

/* ---- Shared selectors ------------------------------------------------- */
/* Several families take these: derivative kernels (Canny, the derivative
 * filters), fixed mask sizes, and norms (|x| max, sum of |x|, root of the sum
 * of squares). */
enum { zelFilterSobel = 2, zelFilterScharr = 5 };
enum { zelMaskSize3x3 = 33, zelMaskSize5x5 = 55 };
enum { zelNormInf = 1, zelNormL1 = 2, zelNormL2 = 4 };

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
ZELCV_API const ZelLibraryVersion* ZELCV_CALL zelcvGetLibVersion(void);

/* ---- State objects ------------------------------------------------------ */
/* Opaque states (the pyramid record and layer states are in zelcv/pyramid.h).
 * An object made by an InitAlloc function is released by the
 * matching Free function; Free(NULL) returns zelStatusNullPointer. */
typedef struct ZeliMorphState ZeliMorphState;
typedef struct ZeliMorphAdvState ZeliMorphAdvState;
typedef struct ZeliInpaintState ZeliInpaintState;

ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyFree(ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliInpaintFree_8u_C1R(ZeliInpaintState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliInpaintFree_8u_C3R(ZeliInpaintState* state);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_BASE_H */
