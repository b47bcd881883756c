// Flood fill: the argument checks, the buffer layouts and the exports of the
// plain, range and gradient criteria.
#include <cstring>
#include <limits.h>
#include <stdint.h>

#include "core/status.h"
#include "segment/floodfill_policies.h"

namespace zelcv {
namespace floodfill {
namespace {

enum class Criterion { Plain, Range, Grad };

// Entries the stack may hold: what the buffer of the reported size keeps
// after its alignment slack (and, for the gradient, after the mask).
int64_t paintCapacity(ZeliSize roi) { return int64_t(roi.width) * roi.height / 4; }
int64_t gradCapacity(ZeliSize roi) { return (16 * int64_t(roi.width) * roi.height + 57) / 24; }

// Pointers (the value pointers of three-channel members among them), size,
// step and step alignment, then the seed.
template <typename T, int C>
ZelStatus checkFill(const T* image, int step, ZeliSize roi, ZeliPoint seed,
                    std::initializer_list<const void*> pointers) {
  if (ZelStatus s = checkImages({zelcv::image(image, step, C)}, roi, pointers)) return s;
  if (seed.x < 0 || seed.x >= roi.width || seed.y < 0 || seed.y >= roi.height)
    return zelStatusOutOfRange;
  return zelStatusOk;
}

// The record is built aside and copied bytewise: the caller's record need
// not sit at its natural alignment.
template <typename T, int C>
void writeRecord(ZeliConnectedComp* region, const Outcome& o, const T* nv) {
  ZeliConnectedComp r;
  r.area = double(o.area);
  for (int c = 0; c < 3; ++c) r.value[c] = c < C ? double(nv[c]) : 0.0;
  r.rect = {o.left, o.top, o.right - o.left + 1, o.bottom - o.top + 1};
  std::memcpy(static_cast<void*>(region), &r, sizeof r);
}

template <typename T, int C>
bool sameAs(const T* a, const T* b) {
  bool eq = true;
  for (int c = 0; c < C; ++c) eq &= a[c] == b[c];
  return eq;
}

template <class Policy, bool kConn8>
Outcome runFill(Policy& p, ZeliSize roi, ZeliPoint seed, Span* stack, int64_t capacity) {
  SpanFill<Policy, kConn8> fill(p, roi.width, roi.height, stack, capacity);
  return fill.run(seed.x, seed.y);
}

// Plain and range fills: the stack starts at the buffer's first 8-byte
// boundary.
template <typename T, int C, bool kConn8, class Test>
void paintFill(T* image, int step, ZeliSize roi, ZeliPoint seed, const T* nv, const Test& test,
               ZeliConnectedComp* region, Zel8u* buffer) {
  PaintPolicy<T, C, Test> p;
  p.base = reinterpret_cast<uint8_t*>(image);
  p.step = step;
  p.width = roi.width;
  p.test = test;
  for (int c = 0; c < C; ++c) p.nv[c] = nv[c];
  if constexpr (kBytes<T, C>) p.prepare(test.lowBound(), test.highBound(), nv[0], test.guards());
  Span* stack = reinterpret_cast<Span*>(alignTo8(buffer));
  writeRecord<T, C>(region, runFill<decltype(p), kConn8>(p, roi, seed, stack, paintCapacity(roi)), nv);
}

template <typename T, int C, bool kConn8>
ZelStatus plainFill(T* image, int step, ZeliSize roi, ZeliPoint seed, const T* nv,
                    ZeliConnectedComp* region, Zel8u* buffer) {
  if (ZelStatus s = checkFill<T, C>(image, step, roi, seed, {region, buffer, nv})) return s;
  const T* s = rowOf<T>(reinterpret_cast<uint8_t*>(image), step, seed.y) + seed.x * C;
  if (sameAs<T, C>(s, nv)) return zelStatusOk;
  EqualTest<T, C> test;
  for (int c = 0; c < C; ++c) test.s[c] = s[c];
  paintFill<T, C, kConn8>(image, step, roi, seed, nv, test, region, buffer);
  return zelStatusOk;
}

template <typename T, int C, bool kConn8>
ZelStatus rangeFill(T* image, int step, ZeliSize roi, ZeliPoint seed, const T* nv, const T* minDelta,
                    const T* maxDelta, ZeliConnectedComp* region, Zel8u* buffer) {
  if (ZelStatus s = checkFill<T, C>(image, step, roi, seed, {region, buffer, nv, minDelta, maxDelta}))
    return s;
  const T* s = rowOf<T>(reinterpret_cast<uint8_t*>(image), step, seed.y) + seed.x * C;
  if (sameAs<T, C>(s, nv)) return zelStatusOk;
  paintFill<T, C, kConn8>(image, step, roi, seed, nv, makeRangeTest<T, C>(s, minDelta, maxDelta, nv),
                          region, buffer);
  return zelStatusOk;
}

template <typename T, int C, bool kConn8>
ZelStatus gradFill(T* image, int step, ZeliSize roi, ZeliPoint seed, const T* nv, const T* minDelta,
                   const T* maxDelta, ZeliConnectedComp* region, Zel8u* buffer) {
  if (ZelStatus s = checkFill<T, C>(image, step, roi, seed, {region, buffer, nv, minDelta, maxDelta}))
    return s;
  if constexpr (std::is_floating_point<T>::value) {
    for (int c = 0; c < C; ++c)
      if (minDelta[c] < 0.0f || maxDelta[c] < 0.0f) return zelStatusOutOfRange;
  }
  const int64_t maskBytes = (int64_t(roi.width) + 2) * (int64_t(roi.height) + 2);
  initMask(buffer, roi.width, roi.height);
  GradPolicy<T, C, kConn8> p{{}, reinterpret_cast<uint8_t*>(image), step, roi.width,
                             buffer + int64_t(roi.width) + 3, int64_t(roi.width) + 2,
                             GradTest<T, C>(minDelta, maxDelta), {}};
  for (int c = 0; c < C; ++c) p.nv[c] = nv[c];
  if constexpr (kBytes<T, C>) p.prepare(minDelta[0], maxDelta[0]);
  Span* stack = reinterpret_cast<Span*>(alignTo8(buffer + maskBytes));
  writeRecord<T, C>(region, runFill<decltype(p), kConn8>(p, roi, seed, stack, gradCapacity(roi)), nv);
  return zelStatusOk;
}

ZelStatus sizeQuery(ZeliSize roi, int* bufferSize, Criterion c) {
  if (ZelStatus s = checkSizeQuery(roi, bufferSize)) return s;
  const int64_t w = roi.width, h = roi.height;
  const int64_t bytes =
      c == Criterion::Grad ? (48 * h * w) / 3 + (w + 2) * (h + 2) + 64 : (24 * h * w) / 4 + 32;
  // A size that an int cannot hold is refused rather than wrapped.
  if (bytes > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(bytes);
  return zelStatusOk;
}

}  // namespace
}  // namespace floodfill
}  // namespace zelcv

using namespace zelcv::floodfill;

ZELCV_ENTRY(zeliFloodFillGetSize)(ZeliSize roiSize, int* bufferSize) {
  return sizeQuery(roiSize, bufferSize, Criterion::Plain);
}
ZELCV_ENTRY(zeliFloodFillGetSize_Grad)(ZeliSize roiSize, int* bufferSize) {
  return sizeQuery(roiSize, bufferSize, Criterion::Grad);
}

// One-channel values by value, three-channel ones through pointers.
#define ZELCV_FF_PLAIN(conn, kConn8, suf, T)                                                         \
  ZELCV_ENTRY(zeliFloodFill_##conn##_##suf##_C1IR)(T * image, int imageStep, ZeliSize roiSize,      \
                                                   ZeliPoint seed, T newVal, ZeliConnectedComp* region, \
                                                   Zel8u* buffer) {                                  \
    return plainFill<T, 1, kConn8>(image, imageStep, roiSize, seed, &newVal, region, buffer);       \
  }
#define ZELCV_FF_PLAIN3(conn, kConn8, suf, T)                                                        \
  ZELCV_ENTRY(zeliFloodFill_##conn##_##suf##_C3IR)(T * image, int imageStep, ZeliSize roiSize,      \
                                                   ZeliPoint seed, const T* newVal,                 \
                                                   ZeliConnectedComp* region, Zel8u* buffer) {      \
    return plainFill<T, 3, kConn8>(image, imageStep, roiSize, seed, newVal, region, buffer);        \
  }
#define ZELCV_FF_DELTA(crit, fn, conn, kConn8, suf, T)                                               \
  ZELCV_ENTRY(zeliFloodFill_##crit##conn##_##suf##_C1IR)(T * image, int imageStep, ZeliSize roiSize, \
                                                         ZeliPoint seed, T newVal, T minDelta,       \
                                                         T maxDelta, ZeliConnectedComp* region,      \
                                                         Zel8u* buffer) {                            \
    return fn<T, 1, kConn8>(image, imageStep, roiSize, seed, &newVal, &minDelta, &maxDelta, region, \
                            buffer);                                                                 \
  }                                                                                                  \
  ZELCV_ENTRY(zeliFloodFill_##crit##conn##_##suf##_C3IR)(T * image, int imageStep, ZeliSize roiSize, \
                                                         ZeliPoint seed, const T* newVal,            \
                                                         const T* minDelta, const T* maxDelta,       \
                                                         ZeliConnectedComp* region, Zel8u* buffer) { \
    return fn<T, 3, kConn8>(image, imageStep, roiSize, seed, newVal, minDelta, maxDelta, region,    \
                            buffer);                                                                 \
  }

ZELCV_FF_PLAIN(4Con, false, 8u, Zel8u)
ZELCV_FF_PLAIN3(4Con, false, 8u, Zel8u)
ZELCV_FF_PLAIN(4Con, false, 16u, Zel16u)
ZELCV_FF_PLAIN3(4Con, false, 16u, Zel16u)
ZELCV_FF_PLAIN(4Con, false, 32s, Zel32s)
ZELCV_FF_PLAIN(4Con, false, 32f, Zel32f)
ZELCV_FF_PLAIN3(4Con, false, 32f, Zel32f)
ZELCV_FF_PLAIN(8Con, true, 8u, Zel8u)
ZELCV_FF_PLAIN3(8Con, true, 8u, Zel8u)
ZELCV_FF_PLAIN(8Con, true, 16u, Zel16u)
ZELCV_FF_PLAIN3(8Con, true, 16u, Zel16u)
ZELCV_FF_PLAIN(8Con, true, 32s, Zel32s)
ZELCV_FF_PLAIN(8Con, true, 32f, Zel32f)
ZELCV_FF_PLAIN3(8Con, true, 32f, Zel32f)

ZELCV_FF_DELTA(Range, rangeFill, 4Con, false, 8u, Zel8u)
ZELCV_FF_DELTA(Range, rangeFill, 4Con, false, 16u, Zel16u)
ZELCV_FF_DELTA(Range, rangeFill, 4Con, false, 32f, Zel32f)
ZELCV_FF_DELTA(Range, rangeFill, 8Con, true, 8u, Zel8u)
ZELCV_FF_DELTA(Range, rangeFill, 8Con, true, 16u, Zel16u)
ZELCV_FF_DELTA(Range, rangeFill, 8Con, true, 32f, Zel32f)

ZELCV_FF_DELTA(Grad, gradFill, 4Con, false, 8u, Zel8u)
ZELCV_FF_DELTA(Grad, gradFill, 4Con, false, 16u, Zel16u)
ZELCV_FF_DELTA(Grad, gradFill, 4Con, false, 32f, Zel32f)
ZELCV_FF_DELTA(Grad, gradFill, 8Con, true, 8u, Zel8u)
ZELCV_FF_DELTA(Grad, gradFill, 8Con, true, 16u, Zel16u)
ZELCV_FF_DELTA(Grad, gradFill, 8Con, true, 32f, Zel32f)
