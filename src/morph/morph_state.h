// Flat-morphology states: the mask analysis, the one state builder shared by
// every GetSize/Init/InitAlloc of the family (and by compound morphology),
// the size rules, and the decoded view that the processing calls use.
#ifndef ZELCV_MORPH_MORPH_STATE_H
#define ZELCV_MORPH_MORPH_STATE_H

#include <stdint.h>

#include "zelcv.h"

namespace zelcv {
namespace morph {

enum Kind : int32_t { kGeneral = 0, kRectangle = 1, kRuns = 2, kEmpty = 3 };

// The state header, at the very start of the state block. Eighteen fields in
// this order; on 32-bit builds each is one 32-bit word (72 bytes, padded to
// an 80-byte header), on 64-bit builds the five pointer fields are pointer
// sized (92 bytes, padded to 96). The block may start at any address, so the
// header is only ever read and written through memcpy.
struct Header {
  void* payload;            //  1 the mask-analysis data after the header (a Shape)
  void* zero1;              //  2 null
  const void* kernelParam;  //  3 the general kernel's on-element table: the mask copy
  void* zero2;              //  4 null
  void* shape;              //  5 the payload again: rectangle or run description
  int32_t maskWidth;        //  6
  int32_t maskHeight;       //  7
  int32_t anchorX;          //  8 zero for kind 3
  int32_t anchorY;          //  9 zero for kind 3
  int32_t internal1;        // 10 zero
  int32_t internal2;        // 11 zero
  int32_t extRowStep;       // 12 bytes of one extended working row, 32-aligned
  int32_t totalSize;        // 13 bytes of the whole state
  int32_t dataType;         // 14 ZelDataType
  int32_t channels;         // 15
  int32_t maxRoiWidth;      // 16
  int32_t reserved;         // 17 -1
  int32_t kind;             // 18 Kind
};
constexpr int kHeaderBytes = sizeof(void*) == 4 ? 80 : 96;
static_assert(sizeof(Header) <= kHeaderBytes, "header does not fit its slot");

// The payload, 8-byte aligned after the header: the rectangle (kind 1; offsets
// may lie outside it), then for kind 2 the non-empty rows in order and the
// table of distinct runs, then the mask copy (A bytes, unaligned), then for
// states of the older interface the work area.
struct Shape {
  int32_t rectWidth, rectHeight;
  int32_t rectOffsetX, rectOffsetY;  // anchor minus the rectangle's first column/row
  int32_t rowCount, runCount;
};
struct RowEntry {
  int32_t dy;   // mask row minus anchor row
  int32_t run;  // index into the run table
};
struct Run {
  int32_t start, end;  // columns relative to the anchor column, start <= 0 <= end
};

// The 1-bit state: its own compact layout (fits align16(A) + 80 bytes).
struct BitHeader {
  int32_t kind, maskWidth, maskHeight, anchorX, anchorY, maxRoiWidth;
};

// How the builder is called.
enum Mode { kModeSize = 0, kModeInit = 1, kModeAlloc = 2 };
enum Flavor {
  kOlder,  // Morphology{GetSize,Init,InitAlloc}: exact size, holds the work area
  kNewer,  // MorphologyBorderInit: size of the BorderGetSize rule, no work area
  kBits    // MorphologyBorderInit_1u
};

struct BuildRequest {
  int mode;
  int flavor;
  int dataType;  // zel8u, zel16u, zel16s, zel32f (zel8u for 1u)
  int channels;
  int roiWidth;
  const Zel8u* mask;
  ZeliSize maskSize;
  ZeliPoint anchor;
  void* state;       // kModeInit
  void** stateOut;   // kModeAlloc
  int* sizeOut;      // kModeSize
};

// The one state builder: checks (mask -8, sizes -6, anchor -34), scratch
// allocation (-9), classification, then by mode stores the size, builds in
// caller memory or allocates.
ZelStatus buildState(const BuildRequest& request);

// Size rules (64-bit results; callers reject what does not fit in 32 bits).
int elementSize(int dataType);
int64_t filterBufferSize(int dataType, int channels, int64_t roiWidth, int64_t maskHeight);
int64_t commonBufferSize(int dataType, int channels, int64_t roiWidth, ZeliSize maskSize);
int64_t borderStateSize(int dataType, int channels, int64_t roiWidth, ZeliSize maskSize, bool bits);

// A state decoded for processing.
struct View {
  int kind, maskWidth, maskHeight, anchorX, anchorY, maxRoiWidth, dataType, channels;
  Shape shape;
  const RowEntry* rows;
  const Run* runs;
  const uint8_t* mask;
  uint8_t* work;  // older states: the work area inside the state
};
View readState(const void* state);
View readBitState(const void* state);

}  // namespace morph
}  // namespace zelcv

#endif  // ZELCV_MORPH_MORPH_STATE_H
