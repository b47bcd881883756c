// The exports of flat morphology: argument checks in the family's order, then
// the shared state builder or the processing cores.
#include <limits.h>

#include "core/status.h"
#include "filter/border.h"
#include "morph/morph_checks.h"
#include "morph/morph_core.h"
#include "morph/morph_state.h"

namespace {

using namespace zelcv;
using namespace zelcv::morph;

template <typename T> constexpr int typeCode();
template <> constexpr int typeCode<Zel8u>() { return zel8u; }
template <> constexpr int typeCode<Zel16u>() { return zel16u; }
template <> constexpr int typeCode<Zel16s>() { return zel16s; }
template <> constexpr int typeCode<Zel32f>() { return zel32f; }

ZelStatus storeSize(int64_t size, int* out) {
  if (size > INT_MAX) return zelStatusBadSize;
  *out = int(size);
  return zelStatusOk;
}

// Row bytes against a step; for 32f the step must then be a multiple of 4.
template <typename T>
ZelStatus checkFilterStep(int step, int64_t rowBytes) {
  if (step < rowBytes) return zelStatusBadStep;
  if (sizeof(T) == 4 && (step & 3)) return zelStatusMisalignedStep;
  return zelStatusOk;
}

template <typename T, int C>
ZelStatus filterMinMax(bool max, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, ZeliSize maskSize,
                       ZeliPoint anchor, Zel8u* buffer) {
  if (ZelStatus s = checkPointers({src, dst, buffer})) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  if (maskSize.height < 1 || maskSize.width < 1) return zelStatusBadMaskSize;
  // The anchor is checked before the steps (deliberate).
  if (anchor.x < 0 || anchor.x >= maskSize.width || anchor.y < 0 || anchor.y >= maskSize.height)
    return zelStatusBadAnchor;
  const int64_t rowBytes = int64_t(roi.width) * C * int64_t(sizeof(T));
  if (ZelStatus s = checkFilterStep<T>(srcStep, rowBytes)) return s;
  if (ZelStatus s = checkFilterStep<T>(dstStep, rowBytes)) return s;
  rectFilter<T>(max, src, srcStep, dst, dstStep, roi, C, maskSize.width, maskSize.height, anchor.x, anchor.y,
                buffer);
  return zelStatusOk;
}

ZelStatus filterBufferQuery(int dataType, int channels, int roiWidth, ZeliSize maskSize, int* bufferSize) {
  if (!bufferSize) return zelStatusNullPointer;
  if (roiWidth < 1) return zelStatusBadSize;
  if (maskSize.width < 1 || maskSize.height < 1) return zelStatusBadMaskSize;
  return storeSize(filterBufferSize(dataType, channels, roiWidth, maskSize.height), bufferSize);
}

ZelStatus checkStateFor(const View& v, int width, int dataType, int channels) {
  if (width > v.maxRoiWidth) return zelStatusBadSize;
  if (v.dataType != dataType) return zelStatusBadDataType;
  if (v.channels != channels) return zelStatusBadChannels;
  return zelStatusOk;
}

template <typename T, int C>
ZelStatus morphBorder(bool dilate, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi,
                      ZeliBorderType border, const ZeliMorphState* state, Zel8u* buffer) {
  if (ZelStatus s = checkPointers({src, dst, state, buffer})) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  if (ZelStatus s = checkMorphSteps<T, C>(srcStep, dstStep, roi.width)) return s;
  const int kind = borderKind(border);
  if (kind != zelBorderReplicate && kind != zelBorderInMemory) return zelStatusBadBorder;
  const View v = readState(state);
  if (ZelStatus s = checkStateFor(v, roi.width, typeCode<T>(), C)) return s;
  if (sizeof(T) == 2 && static_cast<const void*>(src) == static_cast<const void*>(dst))
    return zelStatusInPlaceNotSupported;
  apply<T>(dilate, src, srcStep, dst, dstStep, roi, C, border, v, buffer);
  return zelStatusOk;
}

template <typename T, int C>
ZelStatus morphReplicate(bool dilate, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi,
                         ZeliBorderType border, ZeliMorphState* state) {
  if (ZelStatus s = checkPointers({src, dst, state})) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  if (ZelStatus s = checkMorphSteps<T, C>(srcStep, dstStep, roi.width)) return s;
  if (border != zelBorderReplicate) return zelStatusBadArgument;
  const View v = readState(state);
  if (ZelStatus s = checkStateFor(v, roi.width, typeCode<T>(), C)) return s;
  apply<T>(dilate, src, srcStep, dst, dstStep, roi, C, border, v, v.work);
  return zelStatusOk;
}

ZelStatus morphBits(bool dilate, const Zel8u* src, int srcStep, int srcBitOffset, Zel8u* dst, int dstStep,
                    int dstBitOffset, ZeliSize roi, ZeliBorderType border, const ZeliMorphState* state,
                    Zel8u* buffer) {
  if (ZelStatus s = checkPointers({src, dst, state, buffer})) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  if (ZelStatus s = checkBitSteps(srcStep, srcBitOffset, dstStep, dstBitOffset, roi.width)) return s;
  const int kind = borderKind(border);
  if (kind != zelBorderReplicate && kind != zelBorderInMemory) return zelStatusBadBorder;
  const View v = readBitState(state);
  if (roi.width > v.maxRoiWidth) return zelStatusBadSize;
  if (src == dst) return zelStatusInPlaceNotSupported;
  applyBits(dilate, src, srcStep, srcBitOffset, dst, dstStep, dstBitOffset, roi, border, v, buffer);
  return zelStatusOk;
}

BuildRequest request(int mode, int flavor, int dataType, int channels, int roiWidth, const Zel8u* mask,
                     ZeliSize maskSize, ZeliPoint anchor) {
  return {mode, flavor, dataType, channels, roiWidth, mask, maskSize, anchor, nullptr, nullptr, nullptr};
}

ZelStatus morphologyGetSize(int dataType, int channels, int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                            int* stateSize) {
  if (channels == 1) {  // by formula; the mask is not needed
    if (!stateSize) return zelStatusNullPointer;
    if (roiWidth < 1 || maskSize.width < 1 || maskSize.height < 1) return zelStatusBadSize;
    return storeSize(borderStateSize(dataType, 1, roiWidth, maskSize, false), stateSize);
  }
  BuildRequest q = request(kModeSize, kOlder, dataType, channels, roiWidth, mask, maskSize, {0, 0});
  q.sizeOut = stateSize;
  return buildState(q);
}

ZelStatus morphologyInit(int dataType, int channels, int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                         ZeliPoint anchor, ZeliMorphState* state) {
  BuildRequest q = request(kModeInit, kOlder, dataType, channels, roiWidth, mask, maskSize, anchor);
  q.state = state;
  return buildState(q);
}

ZelStatus morphologyInitAlloc(int dataType, int channels, int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                              ZeliPoint anchor, ZeliMorphState** stateOut) {
  BuildRequest q = request(kModeAlloc, kOlder, dataType, channels, roiWidth, mask, maskSize, anchor);
  q.stateOut = reinterpret_cast<void**>(stateOut);
  return buildState(q);
}

ZelStatus borderGetSize(int dataType, int channels, bool bits, int roiWidth, ZeliSize maskSize, int* stateSize,
                        int* bufferSize) {
  if (!stateSize || !bufferSize) return zelStatusNullPointer;
  if (roiWidth < 1 || maskSize.width < 1 || maskSize.height < 1) return zelStatusBadSize;
  const int64_t state = borderStateSize(dataType, channels, roiWidth, maskSize, bits);
  const int64_t buffer = commonBufferSize(dataType, channels, roiWidth, maskSize);
  if (state > INT_MAX || buffer > INT_MAX) return zelStatusBadSize;
  *stateSize = int(state);
  *bufferSize = int(buffer);
  return zelStatusOk;
}

ZelStatus borderInit(int dataType, int channels, bool bits, int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                     ZeliMorphState* state) {
  // In 64 bits: the sizes are checked after this, and may be INT_MIN.
  const ZeliPoint centre = {int((int64_t(maskSize.width) - 1) / 2), int((int64_t(maskSize.height) - 1) / 2)};
  BuildRequest q = request(kModeInit, bits ? kBits : kNewer, dataType, channels, roiWidth, mask, maskSize, centre);
  q.state = state;
  return buildState(q);
}

}  // namespace

// ---- Max/min filters ------------------------------------------------------
#define ZELCV_FILTER_MINMAX(op, isMax, t, T, C)                                                            \
  ZELCV_ENTRY(zeliFilter##op##BorderReplicate_##t##_C##C##R)(const T* src, int srcStep, T* dst, int dstStep, \
                                                             ZeliSize roiSize, ZeliSize maskSize,          \
                                                             ZeliPoint anchor, Zel8u* buffer) {            \
    return filterMinMax<T, C>(isMax, src, srcStep, dst, dstStep, roiSize, maskSize, anchor, buffer);       \
  }
#define ZELCV_FILTER_BUFFER(name, code, C)                                                \
  ZELCV_SHARED_ENTRY(name)(int roiWidth, ZeliSize maskSize, int* bufferSize) {            \
    return filterBufferQuery(code, C, roiWidth, maskSize, bufferSize);                    \
  }
ZELCV_FILTER_BUFFER(filterMinMaxBufferSize_8u_C1, zel8u, 1)
ZELCV_FILTER_BUFFER(filterMinMaxBufferSize_8u_C3, zel8u, 3)
ZELCV_FILTER_BUFFER(filterMinMaxBufferSize_8u_C4_32f_C1, zel32f, 1)
ZELCV_FILTER_BUFFER(filterMinMaxBufferSize_32f_C3, zel32f, 3)
ZELCV_FILTER_BUFFER(filterMinMaxBufferSize_32f_C4, zel32f, 4)

// ---- Older interface ------------------------------------------------------
#define ZELCV_MORPHOLOGY_OLDER(t, T, C)                                                                     \
  ZELCV_FILTER_MINMAX(Max, true, t, T, C)                                                                   \
  ZELCV_FILTER_MINMAX(Min, false, t, T, C)                                                                  \
  ZELCV_ENTRY(zeliMorphologyGetSize_##t##_C##C##R)(int roiWidth, const Zel8u* mask, ZeliSize maskSize,      \
                                                   int* stateSize) {                                        \
    return morphologyGetSize(typeCode<T>(), C, roiWidth, mask, maskSize, stateSize);                        \
  }                                                                                                         \
  ZELCV_ENTRY(zeliMorphologyInit_##t##_C##C##R)(int roiWidth, const Zel8u* mask, ZeliSize maskSize,         \
                                                ZeliPoint anchor, ZeliMorphState* state) {                  \
    return morphologyInit(typeCode<T>(), C, roiWidth, mask, maskSize, anchor, state);                       \
  }                                                                                                         \
  ZELCV_ENTRY(zeliMorphologyInitAlloc_##t##_C##C##R)(int roiWidth, const Zel8u* mask, ZeliSize maskSize,    \
                                                     ZeliPoint anchor, ZeliMorphState** stateOut) {         \
    return morphologyInitAlloc(typeCode<T>(), C, roiWidth, mask, maskSize, anchor, stateOut);               \
  }                                                                                                         \
  ZELCV_ENTRY(zeliDilateBorderReplicate_##t##_C##C##R)(const T* src, int srcStep, T* dst, int dstStep,      \
                                                       ZeliSize roiSize, ZeliBorderType borderType,         \
                                                       ZeliMorphState* state) {                             \
    return morphReplicate<T, C>(true, src, srcStep, dst, dstStep, roiSize, borderType, state);              \
  }                                                                                                         \
  ZELCV_ENTRY(zeliErodeBorderReplicate_##t##_C##C##R)(const T* src, int srcStep, T* dst, int dstStep,       \
                                                      ZeliSize roiSize, ZeliBorderType borderType,          \
                                                      ZeliMorphState* state) {                              \
    return morphReplicate<T, C>(false, src, srcStep, dst, dstStep, roiSize, borderType, state);             \
  }

// ---- Newer interface ------------------------------------------------------
#define ZELCV_MORPHOLOGY_NEWER(t, T, C, BorderValue)                                                       \
  ZELCV_ENTRY(zeliMorphologyBorderGetSize_##t##_C##C##R)(int roiWidth, ZeliSize maskSize, int* stateSize,  \
                                                         int* bufferSize) {                                \
    return borderGetSize(typeCode<T>(), C, false, roiWidth, maskSize, stateSize, bufferSize);              \
  }                                                                                                        \
  ZELCV_ENTRY(zeliMorphologyBorderInit_##t##_C##C##R)(int roiWidth, const Zel8u* mask, ZeliSize maskSize,  \
                                                      ZeliMorphState* state, Zel8u*) {                     \
    return borderInit(typeCode<T>(), C, false, roiWidth, mask, maskSize, state);                           \
  }                                                                                                        \
  ZELCV_ENTRY(zeliDilateBorder_##t##_C##C##R)(const T* src, int srcStep, T* dst, int dstStep,              \
                                              ZeliSize roiSize, ZeliBorderType borderType, BorderValue,    \
                                              const ZeliMorphState* state, Zel8u* buffer) {                \
    return morphBorder<T, C>(true, src, srcStep, dst, dstStep, roiSize, borderType, state, buffer);        \
  }                                                                                                        \
  ZELCV_ENTRY(zeliErodeBorder_##t##_C##C##R)(const T* src, int srcStep, T* dst, int dstStep,               \
                                             ZeliSize roiSize, ZeliBorderType borderType, BorderValue,     \
                                             const ZeliMorphState* state, Zel8u* buffer) {                 \
    return morphBorder<T, C>(false, src, srcStep, dst, dstStep, roiSize, borderType, state, buffer);       \
  }

// The border value is accepted and never read (there is no constant border).
ZELCV_MORPHOLOGY_OLDER(8u, Zel8u, 1)
ZELCV_MORPHOLOGY_OLDER(8u, Zel8u, 3)
ZELCV_MORPHOLOGY_OLDER(8u, Zel8u, 4)
ZELCV_MORPHOLOGY_OLDER(32f, Zel32f, 1)
ZELCV_MORPHOLOGY_OLDER(32f, Zel32f, 3)
ZELCV_MORPHOLOGY_OLDER(32f, Zel32f, 4)
ZELCV_MORPHOLOGY_NEWER(8u, Zel8u, 1, Zel8u)
ZELCV_MORPHOLOGY_NEWER(8u, Zel8u, 3, const Zel8u*)
ZELCV_MORPHOLOGY_NEWER(8u, Zel8u, 4, const Zel8u*)
ZELCV_MORPHOLOGY_NEWER(32f, Zel32f, 1, Zel32f)
ZELCV_MORPHOLOGY_NEWER(32f, Zel32f, 3, const Zel32f*)
ZELCV_MORPHOLOGY_NEWER(32f, Zel32f, 4, const Zel32f*)
ZELCV_MORPHOLOGY_NEWER(16u, Zel16u, 1, Zel16u)
ZELCV_MORPHOLOGY_NEWER(16s, Zel16s, 1, Zel16s)

// ---- 1-bit images ---------------------------------------------------------
ZELCV_ENTRY(zeliMorphologyBorderGetSize_1u_C1R)(int roiWidth, ZeliSize maskSize, int* stateSize, int* bufferSize) {
  return borderGetSize(zel8u, 1, true, roiWidth, maskSize, stateSize, bufferSize);
}
ZELCV_ENTRY(zeliMorphologyBorderInit_1u_C1R)(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                             ZeliMorphState* state, Zel8u*) {
  return borderInit(zel8u, 1, true, roiWidth, mask, maskSize, state);
}
ZELCV_ENTRY(zeliDilateBorder_1u_C1R)(const Zel8u* src, int srcStep, int srcBitOffset, Zel8u* dst, int dstStep,
                                     int dstBitOffset, ZeliSize roiSize, ZeliBorderType borderType, Zel8u,
                                     const ZeliMorphState* state, Zel8u* buffer) {
  return morphBits(true, src, srcStep, srcBitOffset, dst, dstStep, dstBitOffset, roiSize, borderType, state,
                   buffer);
}
ZELCV_ENTRY(zeliErodeBorder_1u_C1R)(const Zel8u* src, int srcStep, int srcBitOffset, Zel8u* dst, int dstStep,
                                    int dstBitOffset, ZeliSize roiSize, ZeliBorderType borderType, Zel8u,
                                    const ZeliMorphState* state, Zel8u* buffer) {
  return morphBits(false, src, srcStep, srcBitOffset, dst, dstStep, dstBitOffset, roiSize, borderType, state,
                   buffer);
}
