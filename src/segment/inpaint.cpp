// Inpainting by fast marching. InitAlloc runs the march once for a mask:
// distances T from the edge of the known region, spreading into the unknown
// pixels and a little way into the known ones, and the order in which the
// unknown pixels are fixed. Inpaint then fills the unknown pixels in that
// order, each from the known pixels within the radius, weighted by how well
// they line up with T's gradient, by nearness and by how close their T is.
// The state is one block (the shared single-block release frees it); the
// march's heap lives in a scratch block that InitAlloc frees before
// returning.
#include <math.h>
#include <stdint.h>
#include <string.h>

#include "core/alloc.h"
#include "core/sizes.h"
#include "core/status.h"

struct ZeliInpaintState {
  uint32_t id;
  int32_t width, height, channels;
  float radius;
  int32_t unknown;  // pixels to fill
  int32_t ballCount;
  int32_t pad;
  int64_t tOffset, rankOffset, orderOffset, ballOffset;
};

namespace zelcv {
namespace {

constexpr uint32_t kInpaintId = 0x49504E54u;
constexpr float kFar = 1e30f;

struct BallEntry {
  int32_t rx, ry;  // p - q
  float invLen, invLen2;
};

int ballCount(float radius) {
  const int r = int(radius);
  int count = 0;
  for (int ry = -r; ry <= r; ++ry)
    for (int rx = -r; rx <= r; ++rx) {
      const int d2 = rx * rx + ry * ry;
      if (d2 > 0 && float(d2) <= radius * radius) ++count;
    }
  return count;
}

template <typename T>
T* at(ZeliInpaintState* s, int64_t offset) {
  return reinterpret_cast<T*>(reinterpret_cast<uint8_t*>(s) + offset);
}
template <typename T>
const T* at(const ZeliInpaintState* s, int64_t offset) {
  return reinterpret_cast<const T*>(reinterpret_cast<const uint8_t*>(s) + offset);
}

// A binary min-heap of pixel indices keyed by (T, index), with positions for
// decrease-key.
class Heap {
 public:
  Heap(int32_t* items, int32_t* pos, const float* t) : items_(items), pos_(pos), t_(t) {}
  bool empty() const { return size_ == 0; }
  void update(int32_t idx) {  // insert, or move up after T decreased
    int32_t i = pos_[idx];
    if (i < 0) {
      i = size_++;
      items_[i] = idx;
      pos_[idx] = i;
    }
    up(i);
  }
  int32_t pop() {
    const int32_t top = items_[0];
    pos_[top] = -1;
    if (--size_ > 0) {
      items_[0] = items_[size_];
      pos_[items_[0]] = 0;
      down(0);
    }
    return top;
  }

 private:
  bool less(int32_t a, int32_t b) const { return t_[a] < t_[b] || (t_[a] == t_[b] && a < b); }
  void place(int32_t i, int32_t idx) {
    items_[i] = idx;
    pos_[idx] = i;
  }
  void up(int32_t i) {
    const int32_t idx = items_[i];
    while (i > 0) {
      const int32_t parent = (i - 1) / 2;
      if (!less(idx, items_[parent])) break;
      place(i, items_[parent]);
      i = parent;
    }
    place(i, idx);
  }
  void down(int32_t i) {
    const int32_t idx = items_[i];
    for (;;) {
      int32_t c = 2 * i + 1;
      if (c >= size_) break;
      if (c + 1 < size_ && less(items_[c + 1], items_[c])) ++c;
      if (!less(items_[c], idx)) break;
      place(i, items_[c]);
      i = c;
    }
    place(i, idx);
  }

  int32_t* items_;
  int32_t* pos_;
  const float* t_;
  int32_t size_ = 0;
};

enum : uint8_t { kFarPixel = 0, kTrial = 1, kFixed = 2 };

// The march. `unknown` holds 1 for pixels to fill, `boundary` 1 for known
// pixels with an unknown 4-neighbour; both sides grow from the boundary, the
// known side only up to `limit`. Returns the number of unknown pixels fixed.
int32_t march(const uint8_t* unknown, const uint8_t* boundary, int w, int h, float limit, float* t, int32_t* rank,
           int32_t* order, uint8_t* state, int32_t* heapItems, int32_t* heapPos) {
  const int64_t n = int64_t(w) * h;
  for (int64_t i = 0; i < n; ++i) {
    t[i] = boundary[i] ? 0.0f : kFar;
    state[i] = kFarPixel;
    heapPos[i] = -1;
    rank[i] = -1;
  }
  Heap heap(heapItems, heapPos, t);
  for (int64_t i = 0; i < n; ++i)
    if (boundary[i]) {
      state[i] = kTrial;
      heap.update(int32_t(i));
    }
  // A neighbour counts for q when it is fixed and on q's side (or on the edge).
  auto usable = [&](int64_t nb, bool side) { return state[nb] == kFixed && (unknown[nb] == side || boundary[nb]); };
  int32_t filled = 0;
  while (!heap.empty()) {
    const int32_t p = heap.pop();
    state[p] = kFixed;
    if (unknown[p]) {
      rank[p] = filled;
      order[filled++] = p;
    }
    const int py = int(p / w), px = int(p - int64_t(py) * w);
    static const int kDx[4] = {-1, 0, 1, 0}, kDy[4] = {0, -1, 0, 1};
    for (int k = 0; k < 4; ++k) {
      const int qx = px + kDx[k], qy = py + kDy[k];
      if (qx < 0 || qy < 0 || qx >= w || qy >= h) continue;
      const int64_t q = int64_t(qy) * w + qx;
      if (state[q] == kFixed) continue;
      const bool side = unknown[q] != 0;
      float a = kFar, b = kFar;
      if (qx > 0 && usable(q - 1, side)) a = t[q - 1];
      if (qx + 1 < w && usable(q + 1, side) && t[q + 1] < a) a = t[q + 1];
      if (qy > 0 && usable(q - w, side)) b = t[q - w];
      if (qy + 1 < h && usable(q + w, side) && t[q + w] < b) b = t[q + w];
      const float d = a - b;
      const float c = fabsf(d) < 1.0f ? (a + b + sqrtf(2.0f - d * d)) * 0.5f : (a < b ? a : b) + 1.0f;
      if (!side && c > limit) continue;
      if (c < t[q]) {
        t[q] = c;
        state[q] = kTrial;
        heap.update(int32_t(q));
      }
    }
  }
  // Known pixels hold -T; those the march did not reach, -limit.
  for (int64_t i = 0; i < n; ++i)
    if (!unknown[i]) t[i] = state[i] == kFixed ? 0.0f - t[i] : -limit;
  return filled;
}

ZelStatus initAlloc(const Zel8u* mask, int maskStep, ZeliSize roi, Zel32f radius, int channels,
                    ZeliInpaintState** out) {
  if (ZelStatus s = checkImages({maskImage(mask, maskStep)}, roi, {out})) return s;
  if (!(radius >= 1.0f && radius <= 64.0f)) return zelStatusBadArgument;
  const int w = roi.width, h = roi.height;
  const int balls = ballCount(radius);
  const SizeCalc pixels = SizeCalc(w) * SizeCalc(h);
  const SizeCalc head = alignSize(SizeCalc(int64_t(sizeof(ZeliInpaintState))), 16);
  const SizeCalc tBytes = alignSize(SizeCalc(4) * pixels, 16);
  const SizeCalc ballBytes = SizeCalc(16) * SizeCalc(balls);
  // The limit assumes every pixel unknown, so it is known before the mask is
  // read. Scratch: unknown and boundary flags, march state, heap items and
  // positions.
  const SizeCalc largest = head + SizeCalc(3) * tBytes + ballBytes;
  const SizeCalc scratch = SizeCalc(3) * pixels + SizeCalc(8) * pixels + SizeCalc(16);
  if (largest.value() > INT32_MAX || scratch.value() > INT32_MAX) return zelStatusBadSize;
  int64_t unknownCount = 0;
  for (int y = 0; y < h; ++y) {
    const Zel8u* m = mask + int64_t(maskStep) * y;
    for (int x = 0; x < w; ++x) unknownCount += m[x] != 0;
  }
  const SizeCalc orderBytes = alignSize(SizeCalc(4) * SizeCalc(unknownCount), 16);
  const SizeCalc total = head + tBytes + tBytes + orderBytes + ballBytes;

  auto* s = static_cast<ZeliInpaintState*>(allocBytes(int(total.value())));
  if (!s) return zelStatusOutOfMemory;
  uint8_t* work = static_cast<uint8_t*>(allocBytes(int(scratch.value())));
  if (!work) {
    release(s);
    return zelStatusOutOfMemory;
  }
  const int64_t n = pixels.value();
  s->id = kInpaintId;
  s->width = w;
  s->height = h;
  s->channels = channels;
  s->radius = radius;
  s->unknown = int32_t(unknownCount);
  s->ballCount = balls;
  s->pad = 0;
  s->tOffset = head.value();
  s->rankOffset = s->tOffset + tBytes.value();
  s->orderOffset = s->rankOffset + tBytes.value();
  s->ballOffset = s->orderOffset + orderBytes.value();

  uint8_t* unknown = work;
  uint8_t* boundary = work + n;
  uint8_t* state = work + 2 * n;
  int32_t* heapItems = reinterpret_cast<int32_t*>(alignUp(work + 3 * n, 4));
  int32_t* heapPos = heapItems + n;
  for (int y = 0; y < h; ++y) {
    const Zel8u* m = mask + int64_t(maskStep) * y;
    for (int x = 0; x < w; ++x) unknown[int64_t(y) * w + x] = m[x] != 0;
  }
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      const int64_t i = int64_t(y) * w + x;
      boundary[i] = !unknown[i] && ((x > 0 && unknown[i - 1]) || (x + 1 < w && unknown[i + 1]) ||
                                    (y > 0 && unknown[i - w]) || (y + 1 < h && unknown[i + w]));
    }
  // Only a mask covering the whole ROI leaves unknown pixels unreached.
  s->unknown = march(unknown, boundary, w, h, radius + 2.0f, at<float>(s, s->tOffset), at<int32_t>(s, s->rankOffset),
        at<int32_t>(s, s->orderOffset), state, heapItems, heapPos);
  release(work);

  BallEntry* ball = at<BallEntry>(s, s->ballOffset);
  const int r = int(radius);
  int k = 0;
  for (int ry = -r; ry <= r; ++ry)
    for (int rx = -r; rx <= r; ++rx) {
      const int d2 = rx * rx + ry * ry;
      if (d2 == 0 || float(d2) > radius * radius) continue;
      ball[k++] = {rx, ry, 1.0f / sqrtf(float(d2)), 1.0f / float(d2)};
    }
  *out = s;
  return zelStatusOk;
}

// One step of I's gradient at q along an axis: central where both sides are
// known, one-sided where one is, 0 where neither is.
inline float slope(float minus, bool hasMinus, float here, float plus, bool hasPlus) {
  if (hasMinus && hasPlus) return (plus - minus) * 0.5f;
  if (hasPlus) return plus - here;
  if (hasMinus) return here - minus;
  return 0.0f;
}

inline float tSlope(const float* t, int64_t i, int x, int w, int64_t stride) {
  const bool minus = x > 0, plus = x + 1 < w;
  return slope(minus ? t[i - stride] : 0.0f, minus, t[i], plus ? t[i + stride] : 0.0f, plus);
}

template <int C>
void fill(Zel8u* dst, int dstStep, const ZeliInpaintState* s) {
  const int w = s->width, h = s->height;
  const float* t = at<float>(s, s->tOffset);
  const int32_t* rank = at<int32_t>(s, s->rankOffset);
  const int32_t* order = at<int32_t>(s, s->orderOffset);
  const BallEntry* ball = at<BallEntry>(s, s->ballOffset);
  auto pixel = [&](int x, int y) { return dst + int64_t(dstStep) * y + int64_t(x) * C; };
  for (int32_t k = 0; k < s->unknown; ++k) {
    const int32_t p = order[k];
    const int y = int(p / w), x = int(p - int64_t(y) * w);
    float gx = tSlope(t, p, x, w, 1), gy = tSlope(t, p, y, h, w);
    const float len = sqrtf(gx * gx + gy * gy);
    if (len > 0.0f) {
      gx /= len;
      gy /= len;
    }
    // Known at step k: outside the mask (rank -1) or filled before.
    auto known = [&](int qx, int qy) {
      return qx >= 0 && qy >= 0 && qx < w && qy < h && rank[int64_t(qy) * w + qx] < k;
    };
    float num[C] = {}, den = 0.0f;
    const float tp = t[p];
    for (int b = 0; b < s->ballCount; ++b) {
      const BallEntry& e = ball[b];
      const int qx = x - e.rx, qy = y - e.ry;
      if (!known(qx, qy)) continue;
      const int64_t q = int64_t(qy) * w + qx;
      float dir = fabsf(gx * float(e.rx) + gy * float(e.ry)) * e.invLen;
      if (dir < 1e-6f) dir = 1e-6f;
      const float weight = dir * e.invLen2 / (1.0f + fabsf(t[q] - tp));
      const bool l = known(qx - 1, qy), r = known(qx + 1, qy), u = known(qx, qy - 1), d = known(qx, qy + 1);
      const Zel8u* iq = pixel(qx, qy);
      for (int c = 0; c < C; ++c) {
        const float here = iq[c];
        const float sx = slope(l ? float(iq[c - C]) : 0.0f, l, here, r ? float(iq[c + C]) : 0.0f, r);
        const float sy = slope(u ? float(pixel(qx, qy - 1)[c]) : 0.0f, u, here,
                               d ? float(pixel(qx, qy + 1)[c]) : 0.0f, d);
        num[c] += weight * (here + sx * float(e.rx) + sy * float(e.ry));
      }
      den += weight;
    }
    Zel8u* out = pixel(x, y);
    for (int c = 0; c < C; ++c) {
      float v = den > 0.0f ? num[c] / den : 0.0f;
      v = v < 0.0f ? 0.0f : v > 255.0f ? 255.0f : v;
      out[c] = Zel8u(int(v + 0.5f));
    }
  }
}

template <int C>
ZelStatus inpaint(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roi,
                  const ZeliInpaintState* s) {
  if (ZelStatus st = checkImages({image(src, srcStep, C), image(dst, dstStep, C)}, roi, {s})) return st;
  if (s->id != kInpaintId) return zelStatusBadContext;
  if (s->channels != C) return zelStatusBadChannels;
  if (s->width != roi.width || s->height != roi.height) return zelStatusBadSize;
  if (src != dst || srcStep != dstStep)
    for (int y = 0; y < roi.height; ++y)
      memmove(dst + int64_t(dstStep) * y, src + int64_t(srcStep) * y, size_t(roi.width) * C);
  fill<C>(dst, dstStep, s);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using namespace zelcv;

ZELCV_ENTRY(zeliInpaintInitAlloc_8u_C1R)(const Zel8u* mask, int maskStep, ZeliSize roiSize, Zel32f radius,
                                         ZeliInpaintState** state) {
  return initAlloc(mask, maskStep, roiSize, radius, 1, state);
}

ZELCV_ENTRY(zeliInpaintInitAlloc_8u_C3R)(const Zel8u* mask, int maskStep, ZeliSize roiSize, Zel32f radius,
                                         ZeliInpaintState** state) {
  return initAlloc(mask, maskStep, roiSize, radius, 3, state);
}

ZELCV_ENTRY(zeliInpaint_8u_C1R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                const ZeliInpaintState* state) {
  return inpaint<1>(src, srcStep, dst, dstStep, roiSize, state);
}

ZELCV_ENTRY(zeliInpaint_8u_C3R)(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep, ZeliSize roiSize,
                                const ZeliInpaintState* state) {
  return inpaint<3>(src, srcStep, dst, dstStep, roiSize, state);
}
