// Shared pieces of the flat-morphology tests: the table of exports per
// element type and channel count, mask generators and the brute-force
// reference (maximum or minimum over the on elements, border by border).
#ifndef ZELCV_TESTS_MORPH_SUPPORT_H
#define ZELCV_TESTS_MORPH_SUPPORT_H

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <functional>
#include <random>
#include <string>
#include <vector>

#include "support/test_image.h"
#include "zelcv.h"

namespace morphtest {

template <typename T>
struct Api {
  std::string name;
  int channels;
  int typeCode;
  using Border = std::function<ZelStatus(const T*, int, T*, int, ZeliSize, ZeliBorderType, const ZeliMorphState*, Zel8u*)>;
  Border dilate, erode;
  ZelStatus (*borderGetSize)(int, ZeliSize, int*, int*);
  ZelStatus (*borderInit)(int, const Zel8u*, ZeliSize, ZeliMorphState*, Zel8u*);
  // The older interface and the filters (8u and 32f only).
  ZelStatus (*getSize)(int, const Zel8u*, ZeliSize, int*) = nullptr;
  ZelStatus (*init)(int, const Zel8u*, ZeliSize, ZeliPoint, ZeliMorphState*) = nullptr;
  ZelStatus (*initAlloc)(int, const Zel8u*, ZeliSize, ZeliPoint, ZeliMorphState**) = nullptr;
  ZelStatus (*dilateReplicate)(const T*, int, T*, int, ZeliSize, ZeliBorderType, ZeliMorphState*) = nullptr;
  ZelStatus (*erodeReplicate)(const T*, int, T*, int, ZeliSize, ZeliBorderType, ZeliMorphState*) = nullptr;
  ZelStatus (*filterMax)(const T*, int, T*, int, ZeliSize, ZeliSize, ZeliPoint, Zel8u*) = nullptr;
  ZelStatus (*filterMin)(const T*, int, T*, int, ZeliSize, ZeliSize, ZeliPoint, Zel8u*) = nullptr;
  ZelStatus (*filterMaxSize)(int, ZeliSize, int*) = nullptr;
  ZelStatus (*filterMinSize)(int, ZeliSize, int*) = nullptr;
};

// The border value argument is never read; pass something recognisable.
#define MORPHTEST_BORDER_FN(fn, T, bv)                                                                      \
  [](const T* s, int ss, T* d, int ds, ZeliSize r, ZeliBorderType b, const ZeliMorphState* st, Zel8u* buf) { \
    return fn(s, ss, d, ds, r, b, bv, st, buf);                                                             \
  }
#define MORPHTEST_NEWER(t, T, C, bv)                                                                         \
  a.name = #t "_C" #C;                                                                                      \
  a.channels = C;                                                                                           \
  a.dilate = MORPHTEST_BORDER_FN(zeliDilateBorder_##t##_C##C##R, T, bv);                                   \
  a.erode = MORPHTEST_BORDER_FN(zeliErodeBorder_##t##_C##C##R, T, bv);                                     \
  a.borderGetSize = zeliMorphologyBorderGetSize_##t##_C##C##R;                                              \
  a.borderInit = zeliMorphologyBorderInit_##t##_C##C##R;
#define MORPHTEST_OLDER(t, C)                                 \
  a.getSize = zeliMorphologyGetSize_##t##_C##C##R;            \
  a.init = zeliMorphologyInit_##t##_C##C##R;                  \
  a.initAlloc = zeliMorphologyInitAlloc_##t##_C##C##R;        \
  a.dilateReplicate = zeliDilateBorderReplicate_##t##_C##C##R; \
  a.erodeReplicate = zeliErodeBorderReplicate_##t##_C##C##R;  \
  a.filterMax = zeliFilterMaxBorderReplicate_##t##_C##C##R;   \
  a.filterMin = zeliFilterMinBorderReplicate_##t##_C##C##R;   \
  a.filterMaxSize = zeliFilterMaxGetBufferSize_##t##_C##C##R; \
  a.filterMinSize = zeliFilterMinGetBufferSize_##t##_C##C##R;

template <typename T> std::vector<Api<T>> apis();

template <> inline std::vector<Api<Zel8u>> apis() {
  static const Zel8u bv[4] = {0x5A, 0x5A, 0x5A, 0x5A};
  std::vector<Api<Zel8u>> all;
  { Api<Zel8u> a; MORPHTEST_NEWER(8u, Zel8u, 1, Zel8u(7)) MORPHTEST_OLDER(8u, 1) a.typeCode = zel8u; all.push_back(a); }
  { Api<Zel8u> a; MORPHTEST_NEWER(8u, Zel8u, 3, bv) MORPHTEST_OLDER(8u, 3) a.typeCode = zel8u; all.push_back(a); }
  { Api<Zel8u> a; MORPHTEST_NEWER(8u, Zel8u, 4, bv) MORPHTEST_OLDER(8u, 4) a.typeCode = zel8u; all.push_back(a); }
  return all;
}
template <> inline std::vector<Api<Zel32f>> apis() {
  static const Zel32f bv[4] = {1.5f, 1.5f, 1.5f, 1.5f};
  std::vector<Api<Zel32f>> all;
  { Api<Zel32f> a; MORPHTEST_NEWER(32f, Zel32f, 1, 2.5f) MORPHTEST_OLDER(32f, 1) a.typeCode = zel32f; all.push_back(a); }
  { Api<Zel32f> a; MORPHTEST_NEWER(32f, Zel32f, 3, bv) MORPHTEST_OLDER(32f, 3) a.typeCode = zel32f; all.push_back(a); }
  { Api<Zel32f> a; MORPHTEST_NEWER(32f, Zel32f, 4, bv) MORPHTEST_OLDER(32f, 4) a.typeCode = zel32f; all.push_back(a); }
  return all;
}
template <> inline std::vector<Api<Zel16u>> apis() {
  Api<Zel16u> a;
  MORPHTEST_NEWER(16u, Zel16u, 1, Zel16u(9))
  a.typeCode = zel16u;
  return {a};
}
template <> inline std::vector<Api<Zel16s>> apis() {
  Api<Zel16s> a;
  MORPHTEST_NEWER(16s, Zel16s, 1, Zel16s(-9))
  a.typeCode = zel16s;
  return {a};
}

// A copy in a fresh block (TestImage itself must not be copied: its rows
// would still point into the original's block).
template <typename T>
zeltest::TestImage<T> cloneImage(const zeltest::TestImage<T>& from) {
  zeltest::Layout l;
  l.width = from.width();
  l.height = from.height();
  l.channels = from.channels();
  l.padBytes = from.step() - from.width() * from.channels() * int(sizeof(T));
  zeltest::TestImage<T> to(l);
  for (int y = 0; y < l.height; ++y) std::memcpy(to.row(y), from.row(y), size_t(from.width()) * l.channels * sizeof(T));
  return to;
}

// ---- Masks -----------------------------------------------------------------
struct Mask {
  int width = 1, height = 1;
  std::vector<Zel8u> on;  // row-major, any non-zero value is on
  ZeliSize size() const { return {width, height}; }
  bool at(int i, int j) const { return on[size_t(j) * width + i] != 0; }
};

enum class Shape { Rectangle, Disc, Cross, Sparse, Empty, Full, RowsBand };

// Random on values (not only 1), so that "non-zero" is what counts.
inline Zel8u onValue(std::mt19937& rng) { return Zel8u(std::uniform_int_distribution<int>(1, 255)(rng)); }

inline Mask makeMask(std::mt19937& rng, Shape shape, int w, int h) {
  Mask m;
  m.width = w;
  m.height = h;
  m.on.assign(size_t(w) * h, 0);
  auto set = [&](int i, int j) { m.on[size_t(j) * w + i] = onValue(rng); };
  std::uniform_int_distribution<int> any(0, 1 << 20);
  switch (shape) {
    case Shape::Rectangle: {  // a solid sub-rectangle anywhere
      int x0 = any(rng) % w, y0 = any(rng) % h;
      int x1 = x0 + any(rng) % (w - x0), y1 = y0 + any(rng) % (h - y0);
      for (int j = y0; j <= y1; ++j)
        for (int i = x0; i <= x1; ++i) set(i, j);
      break;
    }
    case Shape::Disc: {
      double cx = (w - 1) / 2.0, cy = (h - 1) / 2.0, rx = w / 2.0, ry = h / 2.0;
      for (int j = 0; j < h; ++j)
        for (int i = 0; i < w; ++i) {
          double dx = (i - cx) / rx, dy = (j - cy) / ry;
          if (dx * dx + dy * dy <= 1.0) set(i, j);
        }
      break;
    }
    case Shape::Cross:
      for (int j = 0; j < h; ++j) set((w - 1) / 2, j);
      for (int i = 0; i < w; ++i) set(i, (h - 1) / 2);
      break;
    case Shape::Sparse: {
      int density = 1 + any(rng) % 4;
      for (size_t k = 0; k < m.on.size(); ++k)
        if (any(rng) % 5 < density) m.on[k] = onValue(rng);
      break;
    }
    case Shape::Empty:
      break;
    case Shape::Full:
      for (size_t k = 0; k < m.on.size(); ++k) m.on[k] = onValue(rng);
      break;
    case Shape::RowsBand:  // one run per row around the centre column, some rows empty
      for (int j = 0; j < h; ++j) {
        if (j != (h - 1) / 2 && any(rng) % 3 == 0) continue;
        int c = (w - 1) / 2, l = c - any(rng) % (c + 1), r = c + any(rng) % (w - c);
        for (int i = l; i <= r; ++i) set(i, j);
      }
      break;
  }
  return m;
}

inline Shape randomShape(std::mt19937& rng) {
  return Shape(std::uniform_int_distribution<int>(0, 6)(rng));
}

// ---- Border forms ----------------------------------------------------------
inline ZeliBorderType randomBorder(std::mt19937& rng) {
  int pick = std::uniform_int_distribution<int>(0, 5)(rng);
  if (pick <= 1) return zelBorderReplicate;
  if (pick == 2) return zelBorderInMemory;
  return zelBorderReplicate | (std::uniform_int_distribution<int>(1, 15)(rng) << 4);
}
inline bool memTop(int b) { return (b & 0x10) || (b & 15) == 6; }
inline bool memBottom(int b) { return (b & 0x20) || (b & 15) == 6; }
inline bool memLeft(int b) { return (b & 0x40) || (b & 15) == 6; }
inline bool memRight(int b) { return (b & 0x80) || (b & 15) == 6; }

// ---- Brute-force reference ---------------------------------------------------
// A source ROI inside a larger image: `get(x, y, c)` may read any pixel within
// the margin around the ROI.
template <typename T>
struct Source {
  const zeltest::TestImage<T>* image;
  int margin, width, height, channels;
  T get(int x, int y, int c) const { return image->at(x + margin, y + margin, c); }
  const T* roi() const { return &image->at(margin, margin, 0); }
  int step() const { return image->step(); }
};

inline int clampTo(int v, int n) { return v < 0 ? 0 : (v >= n ? n - 1 : v); }

// dst(x, y) = max (or min) over on elements (i, j) of src(x + i - ax, y + j - ay);
// a side in memory reads the real pixel, other sides the nearest ROI pixel.
// With no on element the result is the source.
template <typename T, typename Get>
T referencePixel(bool max, const Mask& m, int ax, int ay, int border, int W, int H, int x, int y, Get get) {
  bool any = false;
  T best = T();
  for (int j = 0; j < m.height; ++j)
    for (int i = 0; i < m.width; ++i) {
      if (!m.at(i, j)) continue;
      int px = x + i - ax, py = y + j - ay;
      if (!((px < 0 && memLeft(border)) || (px >= W && memRight(border)))) px = clampTo(px, W);
      if (!((py < 0 && memTop(border)) || (py >= H && memBottom(border)))) py = clampTo(py, H);
      T v = get(px, py);
      if (!any || (max ? v > best : v < best)) best = v;
      any = true;
    }
  return any ? best : get(x, y);
}

template <typename T>
zeltest::TestImage<T> reference(bool max, const Source<T>& s, const Mask& m, int ax, int ay, int border) {
  zeltest::Layout l;
  l.width = s.width;
  l.height = s.height;
  l.channels = s.channels;
  zeltest::TestImage<T> out(l);
  for (int y = 0; y < s.height; ++y)
    for (int x = 0; x < s.width; ++x)
      for (int c = 0; c < s.channels; ++c)
        out.at(x, y, c) = referencePixel<T>(max, m, ax, ay, border, s.width, s.height, x, y,
                                            [&](int px, int py) { return s.get(px, py, c); });
  return out;
}

// A block of `bytes` at an odd address followed by guard bytes.
class GuardedBlock {
 public:
  explicit GuardedBlock(size_t bytes, int offset = 3) : bytes_(bytes), offset_(offset) {
    data_.assign(bytes + offset + 64, 0xC3);
  }
  uint8_t* get() { return data_.data() + offset_; }
  bool intact() const {
    for (size_t i = 0; i < size_t(offset_); ++i)
      if (data_[i] != 0xC3) return false;
    for (size_t i = offset_ + bytes_; i < data_.size(); ++i)
      if (data_[i] != 0xC3) return false;
    return true;
  }

 private:
  size_t bytes_;
  int offset_;
  std::vector<uint8_t> data_;
};

}  // namespace morphtest

#endif  // ZELCV_TESTS_MORPH_SUPPORT_H
