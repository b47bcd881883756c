// Grey-level (non-flat) dilation and erosion: the state that holds the
// structuring function and the working rows, and the exports.
//
// Each call keeps a ring of mh extended source rows (the ROI row plus ax
// columns on the left and mw - 1 - ax on the right, built by the library's
// border routine) and computes every output row from the rows its elements
// read. Rows are copied before the output row that overwrites them is
// written, so src == dst works.
//
// An 8u function that is a sum of a column part and a row part, v(i, j) =
// g(i) + h(j), with every value of one sign, is applied in two passes: each
// ring row is replaced by its dilation (erosion) with g as it arrives, and
// the output row combines mh ring rows with h. Integer maxima distribute
// over the sum, and with g and h of one sign the saturation between the
// passes loses nothing (a term pushed below 0 by g stays below 0 after h,
// one pushed above 255 stays above), so the bits are those of the full
// window: mw + mh terms per pixel instead of mw * mh.
#include <limits.h>
#include <string.h>

#include <type_traits>

#include "core/alloc.h"
#include "core/sizes.h"
#include "core/status.h"
#include "filter/border.h"
#include "kernels/dispatch.h"
#include "morph/graymorph_kernels.h"

namespace {

using namespace zelcv;
using graymorph::ElementValue;

// At the 32-aligned start of the state block.
struct GrayHeader {
  int32_t dataType;  // zel8u or zel32f
  int32_t maskWidth, maskHeight, anchorX, anchorY;
  int32_t maxRoiWidth;
  int32_t ringStride;  // bytes of one extended row, a multiple of 32
  int32_t groups[3];   // elements of value 0, of the first and of the second kind
  int32_t separable;   // 8u: two passes, groups for g and columnGroups for h
  int32_t columnGroups[3];
};
constexpr int kHeaderBytes = 64;
static_assert(sizeof(GrayHeader) <= kHeaderBytes, "header slot");

// The parts of a state, from its aligned start.
struct Layout {
  int64_t ringStride, elementPointers, rowPointers, order, values, ring, total;
};

Layout layoutFor(int64_t roiWidth, int64_t mw, int64_t mh, int64_t elementSize) {
  Layout l;
  const int64_t area = mw * mh;
  l.ringStride = alignSize(SizeCalc(roiWidth + mw - 1) * SizeCalc(elementSize), 32).value();
  l.elementPointers = kHeaderBytes;                       // area pointer slots of 8 bytes
  l.rowPointers = l.elementPointers + 8 * area;           // mh pointer slots
  l.order = l.rowPointers + 8 * mh;                          // area int32 element indices
  l.values = alignSize(l.order + 4 * area, int64_t(32));      // area ElementValues, in that order
  l.ring = l.values + 32 * area;
  l.total = (SizeCalc(l.ring) + SizeCalc(mh) * SizeCalc(l.ringStride)).value();
  return l;
}

// The documented size: 128 + 48 A + 8 mh + mh align32((W + mw - 1) e). It
// covers the layout above plus 31 bytes to align the block's start.
int64_t stateSize(int roiWidth, ZeliSize maskSize, int elementSize) {
  const SizeCalc area = SizeCalc(maskSize.width) * SizeCalc(maskSize.height);
  const SizeCalc stride = alignSize(SizeCalc(int64_t(roiWidth) + maskSize.width - 1) * SizeCalc(elementSize), 32);
  return (SizeCalc(128) + SizeCalc(48) * area + SizeCalc(8) * SizeCalc(maskSize.height) +
          SizeCalc(maskSize.height) * stride)
      .value();
}

ZelStatus getSize(int elementSize, int roiWidth, ZeliSize maskSize, int* out) {
  if (!out) return zelStatusNullPointer;
  if (roiWidth < 1 || maskSize.width < 1 || maskSize.height < 1) return zelStatusBadSize;
  const int64_t size = stateSize(roiWidth, maskSize, elementSize);
  if (size > INT_MAX) return zelStatusBadSize;
  *out = int(size);
  return zelStatusOk;
}

uint8_t* stateStart(void* state) { return alignUp(state, 32); }

GrayHeader readHeader(const void* state) {
  GrayHeader h;
  memcpy(&h, alignUp(const_cast<void*>(state), 32), sizeof h);
  return h;
}

ElementValue valueOf(Zel32s v) {
  ElementValue e;
  const int64_t add = v > 0 ? (v > 255 ? 255 : v) : 0;
  const int64_t sub = v < 0 ? (-int64_t(v) > 255 ? 255 : -int64_t(v)) : 0;
  memset(e.bytes, int(add), 16);
  memset(e.bytes + 16, int(sub), 16);
  return e;
}

ElementValue valueOf(Zel32f v) {
  ElementValue e;
  const float neg = -v;
  for (int i = 0; i < 4; ++i) {
    memcpy(e.bytes + 4 * i, &v, 4);
    memcpy(e.bytes + 16 + 4 * i, &neg, 4);
  }
  return e;
}

// Parts of one sign, longest kept: wider functions take the general path.
constexpr int kMaxPart = 64;

// Whether an 8u function (each value clamped to -255..255 first, which
// changes no result) is g(i) + h(j) with all values <= 0 or all >= 0; if so
// fills g (mw values) and h (mh values), each of that sign. A 1-wide or
// 1-high function gains nothing and is not split.
template <typename V>
bool separableParts(const V* mask, ZeliSize maskSize, int64_t* g, int64_t* h) {
  if constexpr (!std::is_same<V, Zel32s>::value) {
    return false;
  } else {
    const int mw = maskSize.width, mh = maskSize.height;
    if (mw < 2 || mh < 2 || mw > kMaxPart || mh > kMaxPart) return false;
    auto c = [&](int i, int j) {
      const int64_t v = mask[j * mw + i];
      return v < -255 ? -255 : v > 255 ? 255 : v;
    };
    int64_t lo = c(0, 0), hi = c(0, 0);
    for (int j = 0; j < mh; ++j)
      for (int i = 0; i < mw; ++i) {
        const int64_t v = c(i, j);
        if (v != c(i, 0) + c(0, j) - c(0, 0)) return false;
        lo = v < lo ? v : lo;
        hi = v > hi ? v : hi;
      }
    if (lo < 0 && hi > 0) return false;
    // g(i) = c(i, 0) - m and h(j) = c(0, j) - c(0, 0) + m, with m the
    // largest (all <= 0) or smallest (all >= 0) of the first row.
    int64_t m = c(0, 0);
    for (int i = 1; i < mw; ++i) m = hi <= 0 ? (c(i, 0) > m ? c(i, 0) : m) : (c(i, 0) < m ? c(i, 0) : m);
    for (int i = 0; i < mw; ++i) g[i] = c(i, 0) - m;
    for (int j = 0; j < mh; ++j) h[j] = c(0, j) - c(0, 0) + m;
    return true;
  }
}

// Checks and builds in `block` (or only checks, for a null block and
// `allocate`, then allocates).
template <typename V>
ZelStatus build(int dataType, int elementSize, int roiWidth, const V* mask, ZeliSize maskSize, ZeliPoint anchor,
                void* block, ZeliMorphGrayState** stateOut) {
  if (!mask || (!block && !stateOut)) return zelStatusNullPointer;
  if (roiWidth < 1 || maskSize.width < 1 || maskSize.height < 1) return zelStatusBadSize;
  const int64_t size = stateSize(roiWidth, maskSize, elementSize);
  if (size > INT_MAX) return zelStatusBadSize;
  if (anchor.x < 0 || anchor.x >= maskSize.width || anchor.y < 0 || anchor.y >= maskSize.height)
    return zelStatusBadAnchor;
  if (!block) {
    block = allocBytes(int(size));
    if (!block) return zelStatusOutOfMemory;
    *stateOut = static_cast<ZeliMorphGrayState*>(block);
  }
  const Layout l = layoutFor(roiWidth, maskSize.width, maskSize.height, elementSize);
  uint8_t* base = stateStart(block);
  GrayHeader h = {dataType, maskSize.width, maskSize.height, anchor.x, anchor.y, roiWidth, int32_t(l.ringStride),
                  {0, 0, 0}, 0, {0, 0, 0}};
  // 8u elements are kept in three groups, each in row-major order: value 0
  // (the pixel itself), positive (one saturating addition) and negative
  // (one saturating subtraction); integer maxima do not depend on the
  // order. 32f keeps row-major order, which decides between equal terms.
  auto* order = reinterpret_cast<int32_t*>(base + l.order);
  auto* values = reinterpret_cast<ElementValue*>(base + l.values);
  const int32_t area = maskSize.width * maskSize.height;
  int32_t k = 0;
  int64_t g[kMaxPart], hv[kMaxPart];
  if (dataType == zel8u && separableParts(mask, maskSize, g, hv)) {
    h.separable = 1;
    // Row pass: elements i with values g(i); column pass: rows j with h(j).
    for (int pass = 0; pass < 2; ++pass) {
      const int n = pass == 0 ? maskSize.width : maskSize.height;
      const int64_t* part = pass == 0 ? g : hv;
      int32_t* counts = pass == 0 ? h.groups : h.columnGroups;
      for (int group = 0; group < 3; ++group)
        for (int32_t e = 0; e < n; ++e) {
          const int64_t v = part[e];
          if ((group == 0 && v == 0) || (group == 1 && v > 0) || (group == 2 && v < 0)) {
            order[k] = e;
            values[k++] = valueOf(Zel32s(v));
            ++counts[group];
          }
        }
    }
  } else if (dataType == zel8u) {
    for (int group = 0; group < 3; ++group)
      for (int32_t e = 0; e < area; ++e) {
        const int64_t v = int64_t(mask[e]);
        if ((group == 0 && v == 0) || (group == 1 && v > 0) || (group == 2 && v < 0)) {
          order[k] = e;
          values[k++] = valueOf(mask[e]);
          ++h.groups[group];
        }
      }
  } else {
    for (; k < area; ++k) {
      order[k] = k;
      values[k] = valueOf(mask[k]);
    }
    h.groups[1] = area;
  }
  memset(base, 0, kHeaderBytes);
  memcpy(base, &h, sizeof h);
  return zelStatusOk;
}

template <typename T>
int typeCode() {
  return sizeof(T) == 1 ? zel8u : zel32f;
}

template <typename T>
void rowKernel(bool dilate, const T* const* sources, const ElementValue* values, const int* groups, T* dst,
               int width, bool inPlace = false) {
  withChosenIsa<IsaLevel::Avx2>([&](auto tag) {
    using Isa = typename decltype(tag)::Isa;
    if constexpr (std::is_same<Isa, simd::Sse2>::value)
      graymorph::row<T, simd::Sse2>(dilate, sources, values, groups, dst, width, inPlace);
    else
      graymorph::rowAvx2(dilate, sources, values, groups, dst, width, inPlace);
  });
}

// The row that stands for source row r (any integer; rows outside the ROI
// as the border says).
template <typename T>
const T* sourceRow(const T* src, int srcStep, ZeliSize roi, ZeliBorderType border, int r) {
  int row = r;
  if (r < 0 && !inMemoryTop(border)) row = 0;
  if (r >= roi.height && !inMemoryBottom(border)) row = roi.height - 1;
  return reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(src) + int64_t(row) * srcStep);
}

// Copies source row r into an extended ring row.
template <typename T>
void extendRow(const T* src, int srcStep, ZeliSize roi, ZeliBorderType border, int r, int ax, int right, T* out) {
  const T* p = sourceRow(src, srcStep, roi, border, r);
  memcpy(out + ax, p, size_t(roi.width) * sizeof(T));
  extendRowBorder<T>(p, roi.width, 1, border, nullptr, ax, right, out, out + ax + roi.width);
}

template <typename T>
void run(bool dilate, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, ZeliBorderType border,
         void* state) {
  uint8_t* base = stateStart(state);
  const GrayHeader h = readHeader(state);
  const int mw = h.maskWidth, mh = h.maskHeight, ax = h.anchorX, ay = h.anchorY;
  const Layout l = layoutFor(h.maxRoiWidth, mw, mh, sizeof(T));
  auto** sources = reinterpret_cast<const T**>(base + l.elementPointers);
  auto** rows = reinterpret_cast<T**>(base + l.rowPointers);
  const auto* order = reinterpret_cast<const int32_t*>(base + l.order);
  const auto* values = reinterpret_cast<const ElementValue*>(base + l.values);
  uint8_t* ring = base + l.ring;
  const int right = mw - 1 - ax;
  const int count = mw * mh;
  // Ring slot s holds source row (y - ay + j) for the j with that row's
  // index modulo mh equal to s.
  auto slot = [&](int64_t r) { return int((r % mh + mh) % mh); };
  auto slotRow = [&](int64_t r) { return reinterpret_cast<T*>(ring + int64_t(slot(r)) * h.ringStride); };
  if (h.separable) {
    // The row pass of source row r into ring row `out` (output x at x).
    // Rows at least twice the window wide are read where they lie, only
    // the ends through small extended copies; narrower ones are extended
    // into the ring row and replaced by their pass in place.
    const int w = roi.width;
    auto rowPass = [&](int64_t r, T* out) {
      if (w < 2 * mw) {
        extendRow(src, srcStep, roi, border, int(r), ax, right, out);
        for (int k = 0; k < mw; ++k) sources[k] = out + order[k];
        rowKernel<T>(dilate, sources, values, h.groups, out, w, true);
        return;
      }
      const T* p = sourceRow(src, srcStep, roi, border, int(r));
      // Positions -ax .. mw - 2 and w - mw + 1 .. w + right - 1.
      T head[2 * kMaxPart], tail[2 * kMaxPart];
      extendRowBorder<T>(p, w, 1, border, nullptr, ax, right, head, tail + mw - 1);
      memcpy(head + ax, p, size_t(mw - 1) * sizeof(T));
      memcpy(tail, p + w - (mw - 1), size_t(mw - 1) * sizeof(T));
      for (int k = 0; k < mw; ++k) sources[k] = head + order[k];
      graymorph::rowScalar(dilate, sources, values, mw, out, 0, ax);
      for (int k = 0; k < mw; ++k) sources[k] = p + order[k];
      rowKernel<T>(dilate, sources, values, h.groups, out + ax, w - mw + 1);
      for (int k = 0; k < mw; ++k) sources[k] = tail + order[k];
      graymorph::rowScalar(dilate, sources, values, mw, out + w - right, 0, right);
    };
    for (int j = 0; j < mh - 1; ++j) rowPass(j - ay, slotRow(j - ay));
    for (int y = 0; y < roi.height; ++y) {
      const int64_t last = int64_t(y) - ay + mh - 1;
      rowPass(last, slotRow(last));
      for (int j = 0; j < mh; ++j) sources[j] = slotRow(int64_t(y) - ay + order[mw + j]);
      T* out = reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(dst) + int64_t(y) * dstStep);
      rowKernel<T>(dilate, sources, values + mw, h.columnGroups, out, roi.width);
    }
    return;
  }
  for (int j = 0; j < mh - 1; ++j) extendRow(src, srcStep, roi, border, j - ay, ax, right, slotRow(j - ay));
  for (int y = 0; y < roi.height; ++y) {
    const int64_t last = int64_t(y) - ay + mh - 1;
    extendRow(src, srcStep, roi, border, int(last), ax, right, slotRow(last));
    for (int j = 0; j < mh; ++j) rows[j] = slotRow(int64_t(y) - ay + j);
    for (int k = 0; k < count; ++k) sources[k] = rows[order[k] / mw] + order[k] % mw;
    T* out = reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(dst) + int64_t(y) * dstStep);
    rowKernel<T>(dilate, sources, values, h.groups, out, roi.width);
  }
}

template <typename T>
ZelStatus apply(bool dilate, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, ZeliBorderType border,
                ZeliMorphGrayState* state) {
  if (ZelStatus s = checkImages({image(src, srcStep), image(dst, dstStep)}, roi, {state})) return s;
  const int kind = borderKind(border);
  if (kind != zelBorderReplicate && kind != zelBorderInMemory) return zelStatusBadBorder;
  const GrayHeader h = readHeader(state);
  if (h.dataType != typeCode<T>()) return zelStatusBadDataType;
  if (roi.width > h.maxRoiWidth) return zelStatusBadSize;
  run<T>(dilate, src, srcStep, dst, dstStep, roi, border, state);
  return zelStatusOk;
}

}  // namespace

ZELCV_ENTRY(zeliMorphGrayGetSize_8u_C1R)(int roiWidth, ZeliSize maskSize, int* stateSize) {
  return getSize(1, roiWidth, maskSize, stateSize);
}
ZELCV_ENTRY(zeliMorphGrayGetSize_32f_C1R)(int roiWidth, ZeliSize maskSize, int* stateSize) {
  return getSize(4, roiWidth, maskSize, stateSize);
}
ZELCV_ENTRY(zeliMorphGrayInit_8u_C1R)(int roiWidth, const Zel32s* mask, ZeliSize maskSize, ZeliPoint anchor,
                                      ZeliMorphGrayState* state) {
  return build(zel8u, 1, roiWidth, mask, maskSize, anchor, state, nullptr);
}
ZELCV_ENTRY(zeliMorphGrayInit_32f_C1R)(int roiWidth, const Zel32f* mask, ZeliSize maskSize, ZeliPoint anchor,
                                       ZeliMorphGrayState* state) {
  return build(zel32f, 4, roiWidth, mask, maskSize, anchor, state, nullptr);
}
ZELCV_ENTRY(zeliMorphGrayInitAlloc_8u_C1R)(int roiWidth, const Zel32s* mask, ZeliSize maskSize, ZeliPoint anchor,
                                           ZeliMorphGrayState** stateOut) {
  return build(zel8u, 1, roiWidth, mask, maskSize, anchor, nullptr, stateOut);
}
ZELCV_ENTRY(zeliMorphGrayInitAlloc_32f_C1R)(int roiWidth, const Zel32f* mask, ZeliSize maskSize,
                                            ZeliPoint anchor, ZeliMorphGrayState** stateOut) {
  return build(zel32f, 4, roiWidth, mask, maskSize, anchor, nullptr, stateOut);
}
// Both Free names share this routine.
ZELCV_SHARED_ENTRY(morphGrayFree)(void* state) {
  if (!state) return zelStatusNullPointer;
  release(state);
  return zelStatusOk;
}

ZELCV_ENTRY(zeliGrayDilateBorder_8u_C1R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                         ZeliBorderType borderType, ZeliMorphGrayState* state) {
  return apply(true, src, srcStep, dst, dstStep, roiSize, borderType, state);
}
ZELCV_ENTRY(zeliGrayErodeBorder_8u_C1R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                        ZeliBorderType borderType, ZeliMorphGrayState* state) {
  return apply(false, src, srcStep, dst, dstStep, roiSize, borderType, state);
}
ZELCV_ENTRY(zeliGrayDilateBorder_32f_C1R)(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                                          ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphGrayState* state) {
  return apply(true, src, srcStep, dst, dstStep, roiSize, borderType, state);
}
ZELCV_ENTRY(zeliGrayErodeBorder_32f_C1R)(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,
                                         ZeliSize roiSize, ZeliBorderType borderType, ZeliMorphGrayState* state) {
  return apply(false, src, srcStep, dst, dstStep, roiSize, borderType, state);
}
