#include "morph/morph_state.h"

#include <limits.h>
#include <string.h>

#include <algorithm>

#include "core/alloc.h"
#include "core/sizes.h"
#include "core/status.h"

namespace zelcv {
namespace morph {

namespace {

SizeCalc align16(SizeCalc n) { return alignSize(n, 16); }

// What the analysis found, kept in the two scratch blocks: per row a status
// byte and the first on column (6 bytes), and per row the last column of the
// run and the index of that run in the table of distinct runs, then the table
// itself (16 bytes per row, plus 48 bytes of counts).
struct Analysis {
  int kind = kGeneral;
  int firstRow = -1, lastRow = -1, nonEmptyRows = 0, runCount = 0;
  uint8_t* perRow = nullptr;   // 6 bytes per row
  uint8_t* runData = nullptr;  // 16 bytes per row + 48
};

int32_t loadInt(const uint8_t* p) {
  int32_t v;
  memcpy(&v, p, 4);
  return v;
}
void storeInt(uint8_t* p, int32_t v) { memcpy(p, &v, 4); }

bool maskIsEmpty(const uint8_t* mask, int64_t area) {
  // Four bytes at a time, then the rest.
  uint32_t any = 0;
  int64_t i = 0;
  for (; i + 4 <= area; i += 4) any |= loadInt(mask + i);
  for (; i < area; ++i) any |= mask[i];
  return any == 0;
}

// Row scan and classification. Returns false as soon as a row holds a second
// run (kind 0).
void classify(const uint8_t* mask, int mw, int mh, int ax, int ay, int dataType, int channels,
              Analysis& a) {
  if (maskIsEmpty(mask, int64_t(mw) * mh)) {
    a.kind = kEmpty;
    return;
  }
  int32_t* lastCol = reinterpret_cast<int32_t*>(a.runData + 48);
  int32_t* runOf = lastCol + mh;
  int32_t* runs = runOf + mh;  // pairs (first, last), absolute columns
  bool rectangle = true, runsCoverAnchor = true;
  int rectFirst = -1, rectLast = -1, previousRow = -1;
  for (int r = 0; r < mh; ++r) {
    const uint8_t* row = mask + int64_t(r) * mw;
    uint8_t* entry = a.perRow + 6 * r;
    int first = 0;
    while (first < mw && !row[first]) ++first;
    entry[0] = first < mw;
    if (first == mw) continue;
    int last = first;
    while (last + 1 < mw && row[last + 1]) ++last;
    for (int i = last + 1; i < mw; ++i)
      if (row[i]) {
        a.kind = kGeneral;  // a second run in this row
        return;
      }
    storeInt(entry + 2, first);
    lastCol[r] = last;
    if (a.firstRow < 0) {
      a.firstRow = r;
      rectFirst = first;
      rectLast = last;
    } else if (previousRow != r - 1 || first != rectFirst || last != rectLast) {
      rectangle = false;
    }
    previousRow = a.lastRow = r;
    ++a.nonEmptyRows;
    if (first > ax || last < ax) runsCoverAnchor = false;
    int k = 0;
    while (k < a.runCount && (runs[2 * k] != first || runs[2 * k + 1] != last)) ++k;
    if (k == a.runCount) {
      runs[2 * k] = first;
      runs[2 * k + 1] = last;
      ++a.runCount;
    }
    runOf[r] = k;
  }
  if (rectangle) {
    a.kind = kRectangle;
  } else if (runsCoverAnchor && ay >= a.firstRow && ay <= a.lastRow) {
    a.kind = kRuns;
    // Float vectors of three or four channels gain nothing from the run
    // table on small elements.
    const int64_t area = int64_t(mw) * mh;
    if (dataType == zel32f && ((channels == 3 && area < 17) || (channels == 4 && area < 49)))
      a.kind = kGeneral;
  } else {
    a.kind = kGeneral;
  }
}

int64_t payloadBytes(const Analysis& a, int64_t area) {
  int64_t tables = a.kind == kRuns ? 8 * int64_t(a.nonEmptyRows + a.runCount) : 0;
  return int64_t(sizeof(Shape)) + tables + area;
}

}  // namespace

int elementSize(int dataType) {
  switch (dataType) {
    case zel16u:
    case zel16s:
      return 2;
    case zel32f:
      return 4;
    default:
      return 1;
  }
}

// The formulas run in saturating size arithmetic: mask heights and widths
// near 2^31 make products (the square of the mask height among them) that
// no 64-bit integer holds; they saturate far above INT_MAX and are refused.
int64_t filterBufferSize(int dataType, int channels, int64_t roiWidth, int64_t maskHeight) {
  const SizeCalc w = roiWidth, mh = maskHeight;
  SizeCalc size;
  if (dataType == zel16u || dataType == zel16s) size = (4 * w + 80) * mh * 2 + 64;
  else if (dataType == zel8u && channels == 1) size = (2 * w + 80) * mh + 32;
  else if (dataType == zel8u && channels == 3) size = ((3 * w + 32) * 2 + 16) * mh + 32;
  else if (dataType == zel32f && channels == 3) size = ((12 * w + 32) * 2 + 16) * mh + 32;
  else if (dataType == zel32f && channels == 4) size = (32 * w + 80) * mh + 32;
  else size = (8 * w + 80) * mh + 32;  // 8u C4 and 32f C1
  return size.value();
}

int64_t commonBufferSize(int dataType, int channels, int64_t roiWidth, ZeliSize maskSize) {
  const SizeCalc w = roiWidth, mh = maskSize.height, area = SizeCalc(maskSize.width) * mh;
  const SizeCalc fast = filterBufferSize(dataType, channels, roiWidth, maskSize.height);
  // The square of the mask height is deliberate: the run kernel keeps the
  // run maxima of a whole mask height of rows.
  const SizeCalc general = (mh * mh + 1) * (w * channels * elementSize(dataType) + 32) + 20 * mh + 36;
  return (maxSize(fast, general) + align16(24 * mh) + align16(area) + align16(16 * mh + 48)).value();
}

int64_t borderStateSize(int dataType, int channels, int64_t roiWidth, ZeliSize maskSize, bool bits) {
  const SizeCalc mh = maskSize.height, area = SizeCalc(maskSize.width) * mh;
  SizeCalc size;
  if (bits)
    size = align16(area) + 80;
  else if (dataType == zel16u || dataType == zel16s)
    size = align16(area) + 16 * mh + 128;
  else  // 8u and 32f states are sized to hold the work buffer too (deliberate).
    size = 33 * align16(area) + 16 * mh + 128 + commonBufferSize(dataType, channels, roiWidth, maskSize);
  return size.value();
}

ZelStatus buildState(const BuildRequest& q) {
  if (!q.mask) return zelStatusNullPointer;
  const int mw = q.maskSize.width, mh = q.maskSize.height;
  if (q.roiWidth < 1 || mw < 1 || mh < 1) return zelStatusBadSize;
  if (q.anchor.x < 0 || q.anchor.x >= mw || q.anchor.y < 0 || q.anchor.y >= mh)
    return zelStatusBadAnchor;
  const int64_t area = int64_t(mw) * mh;
  const bool bits = q.flavor == kBits;
  const int64_t work = commonBufferSize(q.dataType, q.channels, q.roiWidth, q.maskSize);
  if (16 * int64_t(mh) + 48 > INT_MAX || work > INT_MAX) return zelStatusBadSize;

  Analysis a;
  a.perRow = static_cast<uint8_t*>(allocBytes(6 * mh));
  a.runData = static_cast<uint8_t*>(allocBytes(16 * mh + 48));
  if (!a.perRow || !a.runData) {
    release(a.perRow);
    release(a.runData);
    return zelStatusOutOfMemory;
  }
  classify(q.mask, mw, mh, q.anchor.x, q.anchor.y, q.dataType, q.channels, a);

  int64_t size;
  if (bits || q.flavor == kNewer)
    size = borderStateSize(q.dataType, q.channels, q.roiWidth, q.maskSize, bits);
  else
    size = kHeaderBytes + 7 + payloadBytes(a, area) + work;
  ZelStatus status = zelStatusOk;
  uint8_t* block = nullptr;
  if (size > INT_MAX) {
    status = zelStatusBadSize;
  } else if (q.mode == kModeSize) {
    if (!q.sizeOut) status = zelStatusNullPointer;
    else *q.sizeOut = int(size);
  } else if (q.mode == kModeInit) {
    block = static_cast<uint8_t*>(q.state);
    if (!block) status = zelStatusNullPointer;
  } else if (!q.stateOut) {
    status = zelStatusNullPointer;
  } else {
    block = static_cast<uint8_t*>(allocBytes(int(size)));
    if (!block) status = zelStatusOutOfMemory;
  }

  if (status == zelStatusOk && block) {
    const bool empty = a.kind == kEmpty;
    if (bits) {
      BitHeader b = {a.kind, mw, mh, empty ? 0 : q.anchor.x, empty ? 0 : q.anchor.y, q.roiWidth};
      memcpy(block, &b, sizeof b);
      memcpy(block + sizeof b, q.mask, size_t(area));
    } else {
      uint8_t* payload = alignUp(block + kHeaderBytes, 8);
      Shape shape = {};
      RowEntry* rows = reinterpret_cast<RowEntry*>(payload + sizeof(Shape));
      if (a.kind == kRectangle) {
        const int first = loadInt(a.perRow + 6 * a.firstRow + 2);
        const int32_t* lastCol = reinterpret_cast<const int32_t*>(a.runData + 48);
        shape.rectWidth = lastCol[a.firstRow] - first + 1;
        shape.rectHeight = a.nonEmptyRows;
        shape.rectOffsetX = q.anchor.x - first;
        shape.rectOffsetY = q.anchor.y - a.firstRow;
      } else if (a.kind == kRuns) {
        const int32_t* runOf = reinterpret_cast<const int32_t*>(a.runData + 48) + mh;
        const int32_t* runs = runOf + mh;
        shape.rowCount = a.nonEmptyRows;
        shape.runCount = a.runCount;
        int n = 0;
        for (int r = 0; r < mh; ++r)
          if (a.perRow[6 * r]) rows[n++] = {r - q.anchor.y, runOf[r]};
        Run* table = reinterpret_cast<Run*>(rows + n);
        for (int k = 0; k < a.runCount; ++k)
          table[k] = {runs[2 * k] - q.anchor.x, runs[2 * k + 1] - q.anchor.x};
      }
      memcpy(payload, &shape, sizeof shape);
      uint8_t* maskCopy = payload + sizeof(Shape) + 8 * (shape.rowCount + shape.runCount);
      memcpy(maskCopy, q.mask, size_t(area));

      Header h = {};
      h.payload = payload;
      h.kernelParam = maskCopy;
      h.shape = payload;
      h.maskWidth = mw;
      h.maskHeight = mh;
      h.anchorX = empty ? 0 : q.anchor.x;
      h.anchorY = empty ? 0 : q.anchor.y;
      const int64_t ext = alignSize((int64_t(q.roiWidth) + mw - 1) * q.channels * elementSize(q.dataType), 32);
      h.extRowStep = int32_t(std::min<int64_t>(ext, INT_MAX));
      h.totalSize = int32_t(size);
      h.dataType = q.dataType;
      h.channels = q.channels;
      h.maxRoiWidth = q.roiWidth;
      h.reserved = -1;
      h.kind = a.kind;
      memcpy(block, &h, sizeof h);
    }
    if (q.mode == kModeAlloc) *q.stateOut = block;
  }
  release(a.perRow);
  release(a.runData);
  return status;
}

View readState(const void* state) {
  Header h;
  memcpy(&h, state, sizeof h);
  View v = {h.kind, h.maskWidth, h.maskHeight, h.anchorX, h.anchorY, h.maxRoiWidth, h.dataType, h.channels,
            {}, nullptr, nullptr, static_cast<const uint8_t*>(h.kernelParam), nullptr};
  const uint8_t* payload = static_cast<const uint8_t*>(h.shape);
  memcpy(&v.shape, payload, sizeof v.shape);
  v.rows = reinterpret_cast<const RowEntry*>(payload + sizeof(Shape));
  v.runs = reinterpret_cast<const Run*>(v.rows + v.shape.rowCount);
  // Older states keep their work area right after the mask copy.
  v.work = const_cast<uint8_t*>(v.mask) + int64_t(h.maskWidth) * h.maskHeight;
  return v;
}

View readBitState(const void* state) {
  BitHeader b;
  memcpy(&b, state, sizeof b);
  return {b.kind, b.maskWidth, b.maskHeight, b.anchorX, b.anchorY, b.maxRoiWidth, zel8u, 1, {}, nullptr, nullptr,
          static_cast<const uint8_t*>(state) + sizeof b, nullptr};
}

}  // namespace morph
}  // namespace zelcv
