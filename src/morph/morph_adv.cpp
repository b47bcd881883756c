// Compound morphology: opening, closing, top-hat, black-hat and gradient as
// compositions of the flat dilation/erosion cores with an intermediate image
// in the caller's buffer, followed where needed by a per-pixel difference.
#include <limits.h>
#include <stddef.h>
#include <stdint.h>
#include <string.h>

#include <algorithm>

#include "core/alloc.h"
#include "core/checks.h"
#include "core/sizes.h"
#include "core/status.h"
#include "filter/border.h"
#include "kernels/dispatch.h"
#include "kernels/morphadv.h"
#include "morph/morph_checks.h"
#include "morph/morph_core.h"
#include "morph/morph_state.h"

namespace {

using namespace zelcv;
using namespace zelcv::morph;

// The compound state's 32-byte header. On 32-bit builds the three pointers are
// words (20 bytes used); on 64-bit builds they are pointer sized and the five
// fields fill the 32 bytes in the same order. The two sub-states follow: the
// mask (anchor at its centre, serving ROIs widened by maskWidth - 1) at +32,
// its reflection through the centre at +32 + S. Read through memcpy: the
// caller's block may start at any address.
struct AdvHeader {
  void* first;        // 1 sub-state of the mask
  void* second;       // 2 sub-state of the reflected mask
  void* image;        // 3 the gradient's intermediate image
  int32_t capacity;   // 4 bytes of the intermediate image
  int32_t workBytes;  // 5 one sub-operation's working area in the buffer
};
constexpr int kAdvHeaderBytes = 32;
static_assert(sizeof(AdvHeader) <= kAdvHeaderBytes, "compound header does not fit");

enum Op { kOpen, kClose, kTophat, kBlackhat, kGradient };

template <typename T> constexpr int typeCode();
template <> constexpr int typeCode<Zel8u>() { return zel8u; }
template <> constexpr int typeCode<Zel16u>() { return zel16u; }
template <> constexpr int typeCode<Zel16s>() { return zel16s; }
template <> constexpr int typeCode<Zel32f>() { return zel32f; }

// The size rules: S and B are those of the plain ROI width (deliberately, even
// though the first sub-state serves the widened width); R is a widened row.
struct Sizes {
  int64_t subState, work, capacity;
};
// Saturating arithmetic: the sizes may be anything up to INT_MAX here.
Sizes sizesFor(int dataType, int channels, bool bits, ZeliSize roi, ZeliSize mask) {
  const SizeCalc rowBytes =
      alignSize((SizeCalc(roi.width) + mask.width - 1) * channels * elementSize(dataType), 32);
  return {borderStateSize(dataType, channels, roi.width, mask, bits),
          commonBufferSize(dataType, channels, roi.width, mask),
          (rowBytes * (SizeCalc(roi.height) + mask.height - 1)).value()};
}
bool badSizes(ZeliSize roi, ZeliSize mask) {
  return roi.width < 1 || roi.height < 1 || mask.width < 1 || mask.height < 1;
}

ZelStatus advGetSize(int dataType, int channels, bool bits, ZeliSize roi, ZeliSize mask, int* stateSize,
                     int* bufferSize) {
  if (!stateSize || !bufferSize) return zelStatusNullPointer;
  if (badSizes(roi, mask)) return zelStatusBadSize;
  const Sizes z = sizesFor(dataType, channels, bits, roi, mask);
  const int64_t state = 2 * z.subState + kAdvHeaderBytes, buffer = z.capacity + 2 * z.work;
  if (state > INT_MAX || buffer > INT_MAX) return zelStatusBadSize;
  *stateSize = int(state);
  *bufferSize = int(buffer);
  return zelStatusOk;
}

// Where the intermediate image starts in a buffer: after the two working
// areas, moved back to its element alignment (the buffer may start at any
// address; the working areas align their own parts and leave more than
// those few bytes unused at their end).
uint8_t* imageStart(uint8_t* buffer, int64_t workBytes, int elementBytes) {
  const uintptr_t at = reinterpret_cast<uintptr_t>(buffer + 2 * workBytes);
  return buffer + 2 * workBytes - ptrdiff_t(at & uintptr_t(elementBytes - 1));
}

void reflect(Zel8u* mask, ZeliSize size) { std::reverse(mask, mask + int64_t(size.width) * size.height); }

// Builds the two sub-states (mode init into `first`/`second`, or mode alloc
// storing the pointers there). The mask is reflected in place for the second
// and always restored.
ZelStatus buildPair(int mode, int dataType, int channels, bool bits, ZeliSize roi, Zel8u* mask,
                    ZeliSize maskSize, ZeliPoint anchor, void** first, void** second) {
  BuildRequest q = {mode,   bits ? kBits : kNewer, dataType, channels, roi.width + maskSize.width - 1,
                    mask,   maskSize,              anchor,   *first,   first,
                    nullptr};
  if (ZelStatus s = buildState(q)) return s;
  q.roiWidth = roi.width;
  q.anchor = {maskSize.width - 1 - anchor.x, maskSize.height - 1 - anchor.y};
  q.state = *second;
  q.stateOut = second;
  reflect(mask, maskSize);
  const ZelStatus s = buildState(q);
  reflect(mask, maskSize);
  return s;
}

ZelStatus advInit(int dataType, int channels, bool bits, ZeliSize roi, Zel8u* mask, ZeliSize maskSize,
                  ZeliMorphAdvState* state, Zel8u* buffer) {
  if (ZelStatus s = checkPointers({mask, state, buffer})) return s;
  if (badSizes(roi, maskSize)) return zelStatusBadSize;
  const Sizes z = sizesFor(dataType, channels, bits, roi, maskSize);
  if (2 * z.subState + kAdvHeaderBytes > INT_MAX || z.capacity + 2 * z.work > INT_MAX) return zelStatusBadSize;
  uint8_t* block = reinterpret_cast<uint8_t*>(state);
  AdvHeader h = {block + kAdvHeaderBytes, block + kAdvHeaderBytes + z.subState,
                 imageStart(buffer, z.work, elementSize(bits ? zel8u : dataType)), int32_t(z.capacity),
                 int32_t(z.work)};
  const ZeliPoint centre = {(maskSize.width - 1) / 2, (maskSize.height - 1) / 2};
  if (ZelStatus s = buildPair(kModeInit, dataType, channels, bits, roi, mask, maskSize, centre, &h.first,
                              &h.second))
    return s;
  memcpy(block, &h, sizeof h);
  return zelStatusOk;
}

ZelStatus advInitAlloc(int dataType, int channels, ZeliMorphAdvState** stateOut, ZeliSize roi, Zel8u* mask,
                       ZeliSize maskSize, ZeliPoint anchor) {
  if (!stateOut || !mask) return zelStatusNullPointer;
  if (badSizes(roi, maskSize)) return zelStatusBadSize;
  if (anchor.x < 0 || anchor.x >= maskSize.width || anchor.y < 0 || anchor.y >= maskSize.height)
    return zelStatusBadAnchor;
  const Sizes z = sizesFor(dataType, channels, false, roi, maskSize);
  if (z.capacity > INT_MAX || z.work > INT_MAX) return zelStatusBadSize;
  AdvHeader h = {nullptr, nullptr, nullptr, int32_t(z.capacity), int32_t(z.work)};
  void* head = allocBytes(kAdvHeaderBytes);
  ZelStatus s = head ? zelStatusOk : zelStatusOutOfMemory;
  if (!s) s = buildPair(kModeAlloc, dataType, channels, false, roi, mask, maskSize, anchor, &h.first, &h.second);
  if (!s && !(h.image = allocBytes(int(z.capacity)))) s = zelStatusOutOfMemory;
  if (s) {
    release(h.first);
    release(h.second);
    release(h.image);
    release(head);
    return s;
  }
  memcpy(head, &h, sizeof h);
  *stateOut = static_cast<ZeliMorphAdvState*>(head);
  return zelStatusOk;
}

// An image plane: base pointer, row step, and for 1-bit images the bit offset
// of the first pixel (kept within 0..7 by `shifted`).
struct Plane {
  uint8_t* base;
  int step;
  int bitOffset;
};

// Per-format pieces of the composition: moving a plane, one flat pass, the
// row step of an intermediate image and the difference.
template <typename T, int C>
struct Typed {
  static constexpr int kElementBytes = int(sizeof(T));
  static Plane shifted(Plane p, int dx, int dy) {
    return {p.base + int64_t(dy) * p.step + int64_t(dx) * C * int64_t(sizeof(T)), p.step, 0};
  }
  static int64_t rowBytes(int64_t width) { return alignSize(width * C * int64_t(sizeof(T)), 32); }
  static View view(const void* state) { return readState(state); }
  static void pass(bool dilate, Plane s, Plane d, ZeliSize roi, ZeliBorderType border, const View& v,
                   uint8_t* work, int64_t, const RowSink& sink) {
    apply<T>(dilate, reinterpret_cast<const T*>(s.base), s.step, reinterpret_cast<T*>(d.base), d.step, roi, C,
             border, v, work, sink);
  }
  static void difference(Plane a, Plane b, Plane out, int width, int y) {
    const T* pa = reinterpret_cast<const T*>(a.base + int64_t(y) * a.step);
    const T* pb = reinterpret_cast<const T*>(b.base + int64_t(y) * b.step);
    T* po = reinterpret_cast<T*>(out.base + int64_t(y) * out.step);
    withChosenIsa<IsaLevel::Avx2>(
        [&](auto isa) { morphadv::differenceRow<T, typename decltype(isa)::Isa>(pa, pb, po, width * C); });
  }
};

struct Bits {
  static constexpr int kElementBytes = 1;
  static Plane shifted(Plane p, int dx, int dy) {
    const int bit = p.bitOffset + dx;
    const int bytes = bit >= 0 ? bit / 8 : -((7 - bit) / 8);  // floor division
    return {p.base + int64_t(dy) * p.step + bytes, p.step, bit - 8 * bytes};
  }
  static int64_t rowBytes(int64_t width) { return alignSize((width + 7) / 8, 32); }
  static View view(const void* state) { return readBitState(state); }
  // The 1-bit core keeps a ring of maskHeight + 1 unpacked rows of the
  // extended width; when the working memory is short of that, the ROI is
  // done in column strips whose inner sides are read from memory.
  static void pass(bool dilate, Plane s, Plane d, ZeliSize roi, ZeliBorderType border, const View& v,
                   uint8_t* work, int64_t workBytes, const RowSink& sink) {
    if (borderKind(border) == zelBorderInMemory) border = zelBorderReplicate | 0xF0;
    const int64_t slot = (workBytes - 31) / (v.maskHeight + 1) / 32 * 32;
    const int strip = int(std::max<int64_t>(1, std::min<int64_t>(roi.width, slot - (v.maskWidth - 1))));
    for (int x0 = 0; x0 < roi.width; x0 += strip) {
      const int w = std::min(strip, roi.width - x0);
      int b = border & ~(zelBorderInMemLeft | zelBorderInMemRight);
      if (x0 > 0 || inMemoryLeft(border)) b |= zelBorderInMemLeft;
      if (x0 + w < roi.width || inMemoryRight(border)) b |= zelBorderInMemRight;
      applyBits(dilate, s.base, s.step, s.bitOffset + x0, d.base, d.step, d.bitOffset + x0, {w, roi.height},
                ZeliBorderType(b), v, work);
    }
    for (int y = 0; y < roi.height; ++y) sink(y);
  }
  static bool bit(const Plane& p, int x, int y) {
    const int i = p.bitOffset + x;
    return (p.base[int64_t(y) * p.step + (i >> 3)] >> (7 - (i & 7))) & 1;
  }
  static void difference(Plane a, Plane b, Plane out, int width, int y) {
    for (int x = 0; x < width; ++x) {
      const bool on = bit(a, x, y) && !bit(b, x, y);
      const int i = out.bitOffset + x;
      uint8_t& byte = out.base[int64_t(y) * out.step + (i >> 3)];
      const uint8_t mask = uint8_t(0x80 >> (i & 7));
      byte = on ? uint8_t(byte | mask) : uint8_t(byte & ~mask);
    }
  }
};

// out = a - b, row by row as the last pass finishes each row of its output
// (the rows are then still in the cache).
template <class F>
struct DifferenceSink {
  Plane a, b, out;
  int width;
  static void row(const void* self, int y) {
    const DifferenceSink* d = static_cast<const DifferenceSink*>(self);
    F::difference(d->a, d->b, d->out, d->width, y);
  }
  RowSink sink() const {
    RowSink r;
    r.fn = &row;
    r.context = this;
    return r;
  }
};

// Opening (erosion first) or closing (dilation first): the first pass writes
// the intermediate image, widened on the sides read from memory by the
// reach of the second element so that the second pass finds the pixels it
// needs around the ROI already processed.
template <class F>
ZelStatus openClose(bool closing, Plane src, Plane dst, ZeliSize roi, ZeliBorderType border, const AdvHeader& h,
                    uint8_t* buffer, const RowSink& sink) {
  const View v1 = F::view(h.first), v2 = F::view(h.second);
  int flags = border & 0xF0;
  if (borderKind(border) == zelBorderInMemory) flags = 0xF0;
  if (v2.kind == kEmpty) flags = 0;  // both passes copy: nothing around the ROI is needed
  const int left = (flags & zelBorderInMemLeft) ? v2.anchorX : 0;
  const int right = (flags & zelBorderInMemRight) ? v2.maskWidth - 1 - v2.anchorX : 0;
  const int top = (flags & zelBorderInMemTop) ? v2.anchorY : 0;
  const int bottom = (flags & zelBorderInMemBottom) ? v2.maskHeight - 1 - v2.anchorY : 0;
  // The widened size in 64 bits: the ROI may reach INT_MAX, and only the
  // capacity test below tells whether the widened image fits.
  const int64_t wideWidth = int64_t(roi.width) + left + right, wideHeight = int64_t(roi.height) + top + bottom;
  const int64_t step = F::rowBytes(wideWidth);
  if ((SizeCalc(step) * wideHeight).value() > h.capacity) return zelStatusBadSize;
  const ZeliSize wide = {int(wideWidth), int(wideHeight)};
  // The two sub-operations run one after the other, so each may use both
  // working areas.
  const int64_t work = 2 * int64_t(h.workBytes);
  const Plane image = {imageStart(buffer, h.workBytes, F::kElementBytes), int(step), 0};
  F::pass(closing, F::shifted(src, -left, -top), image, wide, border, v1, buffer, work, RowSink());
  F::pass(!closing, F::shifted(image, left, top), dst, roi, border, v2, buffer, work, sink);
  return zelStatusOk;
}

template <class F>
ZelStatus compose(Op op, Plane src, Plane dst, ZeliSize roi, ZeliBorderType border, const AdvHeader& h,
                  uint8_t* buffer) {
  if (op == kGradient) {
    const int64_t step = F::rowBytes(roi.width);
    if ((SizeCalc(step) * roi.height).value() > h.capacity) return zelStatusBadSize;
    const View v = F::view(h.first);
    const Plane image = {static_cast<uint8_t*>(h.image), int(step), 0};
    const int64_t work = 2 * int64_t(h.workBytes);  // sequential passes: both areas each
    const DifferenceSink<F> difference = {dst, image, dst, roi.width};
    F::pass(true, src, dst, roi, border, v, buffer, work, RowSink());
    F::pass(false, src, image, roi, border, v, buffer, work, difference.sink());
    return zelStatusOk;
  }
  DifferenceSink<F> difference = {src, dst, dst, roi.width};  // top-hat
  if (op == kBlackhat) difference = {dst, src, dst, roi.width};
  const bool plain = op == kOpen || op == kClose;
  return openClose<F>(op == kClose || op == kBlackhat, src, dst, roi, border, h, buffer,
                      plain ? RowSink() : difference.sink());
}

// Checks shared after the pointer, size and step checks: the border, the
// widths the two sub-states serve, and in-place use of the differences
// (they need the source after the destination is written).
template <class F>
ZelStatus checkRest(Op op, const void* src, const void* dst, int width, ZeliBorderType border,
                    const AdvHeader& h) {
  const int kind = borderKind(border);
  if (kind != zelBorderReplicate && kind != zelBorderInMemory) return zelStatusBadBorder;
  if (width > F::view(h.first).maxRoiWidth || width > F::view(h.second).maxRoiWidth) return zelStatusBadSize;
  if (op != kOpen && op != kClose && src == dst) return zelStatusInPlaceNotSupported;
  return zelStatusOk;
}

AdvHeader header(const ZeliMorphAdvState* state) {
  AdvHeader h;
  memcpy(&h, state, sizeof h);
  return h;
}

template <typename T, int C>
ZelStatus morphAdv(Op op, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, ZeliBorderType border,
                   const ZeliMorphAdvState* state, Zel8u* buffer) {
  if (ZelStatus s = checkPointers({src, dst, state, buffer})) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  if (ZelStatus s = checkMorphSteps<T, C>(srcStep, dstStep, roi.width)) return s;
  const AdvHeader h = header(state);
  if (ZelStatus s = checkRest<Typed<T, C>>(op, src, dst, roi.width, border, h)) return s;
  const View v = readState(h.first);
  if (v.dataType != typeCode<T>()) return zelStatusBadDataType;
  if (v.channels != C) return zelStatusBadChannels;
  const Plane s = {reinterpret_cast<uint8_t*>(const_cast<T*>(src)), srcStep, 0};
  const Plane d = {reinterpret_cast<uint8_t*>(dst), dstStep, 0};
  return compose<Typed<T, C>>(op, s, d, roi, border, h, buffer);
}

ZelStatus morphAdvBits(Op op, const Zel8u* src, int srcStep, int srcBitOffset, Zel8u* dst, int dstStep,
                       int dstBitOffset, ZeliSize roi, ZeliBorderType border, const ZeliMorphAdvState* state,
                       Zel8u* buffer) {
  if (ZelStatus s = checkPointers({src, dst, state, buffer})) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  if (ZelStatus s = checkBitSteps(srcStep, srcBitOffset, dstStep, dstBitOffset, roi.width)) return s;
  const AdvHeader h = header(state);
  if (ZelStatus s = checkRest<Bits>(op, src, dst, roi.width, border, h)) return s;
  const Plane s = Bits::shifted({const_cast<Zel8u*>(src), srcStep, 0}, srcBitOffset, 0);
  const Plane d = Bits::shifted({dst, dstStep, 0}, dstBitOffset, 0);
  return compose<Bits>(op, s, d, roi, border, h, buffer);
}

}  // namespace

ZELCV_ENTRY(zeliMorphAdvFree)(ZeliMorphAdvState* state) {
  if (!state) return zelStatusNullPointer;
  const AdvHeader h = header(state);
  release(h.first);
  release(h.second);
  release(h.image);
  release(state);
  return zelStatusOk;
}

#define ZELCV_MORPHADV_OP(op, code, t, T, C, BorderValue)                                                    \
  ZELCV_ENTRY(zeliMorph##op##Border_##t##_C##C##R)(const T* src, int srcStep, T* dst, int dstStep,         \
                                                   ZeliSize roiSize, ZeliBorderType borderType, BorderValue, \
                                                   const ZeliMorphAdvState* state, Zel8u* buffer) {        \
    return morphAdv<T, C>(code, src, srcStep, dst, dstStep, roiSize, borderType, state, buffer);           \
  }
#define ZELCV_MORPHADV_COMMON(t, T, C, BorderValue)                                                         \
  ZELCV_ENTRY(zeliMorphAdvGetSize_##t##_C##C##R)(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,      \
                                                 int* bufferSize) {                                        \
    return advGetSize(typeCode<T>(), C, false, roiSize, maskSize, stateSize, bufferSize);                  \
  }                                                                                                        \
  ZELCV_ENTRY(zeliMorphAdvInit_##t##_C##C##R)(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,            \
                                              ZeliMorphAdvState* state, Zel8u* buffer) {                   \
    return advInit(typeCode<T>(), C, false, roiSize, mask, maskSize, state, buffer);                       \
  }                                                                                                        \
  ZELCV_MORPHADV_OP(Open, kOpen, t, T, C, BorderValue)                                                     \
  ZELCV_MORPHADV_OP(Close, kClose, t, T, C, BorderValue)                                                   \
  ZELCV_MORPHADV_OP(Tophat, kTophat, t, T, C, BorderValue)                                                 \
  ZELCV_MORPHADV_OP(Blackhat, kBlackhat, t, T, C, BorderValue)                                             \
  ZELCV_MORPHADV_OP(Gradient, kGradient, t, T, C, BorderValue)
#define ZELCV_MORPHADV_ALLOC(t, T, C)                                                                      \
  ZELCV_ENTRY(zeliMorphAdvInitAlloc_##t##_C##C##R)(ZeliMorphAdvState** stateOut, ZeliSize roiSize,        \
                                                   Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor) {    \
    return advInitAlloc(typeCode<T>(), C, stateOut, roiSize, mask, maskSize, anchor);                     \
  }

// The border value is accepted and never read.
ZELCV_MORPHADV_COMMON(8u, Zel8u, 1, Zel8u)
ZELCV_MORPHADV_COMMON(8u, Zel8u, 3, const Zel8u*)
ZELCV_MORPHADV_COMMON(8u, Zel8u, 4, const Zel8u*)
ZELCV_MORPHADV_COMMON(32f, Zel32f, 1, Zel32f)
ZELCV_MORPHADV_COMMON(32f, Zel32f, 3, const Zel32f*)
ZELCV_MORPHADV_COMMON(32f, Zel32f, 4, const Zel32f*)
ZELCV_MORPHADV_COMMON(16u, Zel16u, 1, Zel16u)
ZELCV_MORPHADV_COMMON(16s, Zel16s, 1, Zel16s)
ZELCV_MORPHADV_ALLOC(8u, Zel8u, 1)
ZELCV_MORPHADV_ALLOC(8u, Zel8u, 3)
ZELCV_MORPHADV_ALLOC(8u, Zel8u, 4)
ZELCV_MORPHADV_ALLOC(32f, Zel32f, 1)
ZELCV_MORPHADV_ALLOC(32f, Zel32f, 3)
ZELCV_MORPHADV_ALLOC(32f, Zel32f, 4)

// ---- 1-bit images ---------------------------------------------------------
ZELCV_ENTRY(zeliMorphAdvGetSize_1u_C1R)(ZeliSize roiSize, ZeliSize maskSize, int* stateSize, int* bufferSize) {
  return advGetSize(zel8u, 1, true, roiSize, maskSize, stateSize, bufferSize);
}
ZELCV_ENTRY(zeliMorphAdvInit_1u_C1R)(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize, ZeliMorphAdvState* state,
                                     Zel8u* buffer) {
  return advInit(zel8u, 1, true, roiSize, mask, maskSize, state, buffer);
}
#define ZELCV_MORPHADV_BITS(op, code)                                                                      \
  ZELCV_ENTRY(zeliMorph##op##Border_1u_C1R)(const Zel8u* src, int srcStep, int srcBitOffset, Zel8u* dst,  \
                                            int dstStep, int dstBitOffset, ZeliSize roiSize,              \
                                            ZeliBorderType borderType, Zel8u, const ZeliMorphAdvState* state, \
                                            Zel8u* buffer) {                                              \
    return morphAdvBits(code, src, srcStep, srcBitOffset, dst, dstStep, dstBitOffset, roiSize, borderType,  \
                        state, buffer);                                                                   \
  }
ZELCV_MORPHADV_BITS(Open, kOpen)
ZELCV_MORPHADV_BITS(Close, kClose)
ZELCV_MORPHADV_BITS(Tophat, kTophat)
ZELCV_MORPHADV_BITS(Blackhat, kBlackhat)
ZELCV_MORPHADV_BITS(Gradient, kGradient)
