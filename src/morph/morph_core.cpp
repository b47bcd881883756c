#include "morph/morph_core.h"

#include "kernels/dispatch.h"
#include "morph/morph_cores.h"

namespace zelcv {
namespace morph {

namespace {

int bitAt(const uint8_t* row, int64_t position) {
  return (row[position >> 3] >> (7 - (position & 7))) & 1;
}


}  // namespace

template <typename T>
void rectFilter(bool max, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int channels, int rw,
                int rh, int ox, int oy, uint8_t* work) {
  withChosenIsa<IsaLevel::Avx2>([&](auto isa) {
    Cores<T, typename decltype(isa)::Isa>::rect(max, src, srcStep, dst, dstStep, roi, channels, rw, rh, ox, oy, work);
  });
}

template <typename T>
void apply(bool dilate, const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, int channels,
           ZeliBorderType border, const View& state, uint8_t* work, const RowSink& sink) {
  withChosenIsa<IsaLevel::Avx2>([&](auto isa) {
    Cores<T, typename decltype(isa)::Isa>::apply(dilate, src, srcStep, dst, dstStep, roi, channels, border, state,
                                                 work, sink);
  });
}

#define ZELCV_MORPH_INSTANTIATE(T)                                                                  \
  template struct Cores<T, simd::Sse2>;                                                               \
  template void rectFilter<T>(bool, const T*, int, T*, int, ZeliSize, int, int, int, int, int, uint8_t*); \
  template void apply<T>(bool, const T*, int, T*, int, ZeliSize, int, ZeliBorderType, const View&, uint8_t*, \
                         const RowSink&);
ZELCV_MORPH_INSTANTIATE(uint8_t)
ZELCV_MORPH_INSTANTIATE(uint16_t)
ZELCV_MORPH_INSTANTIATE(int16_t)
ZELCV_MORPH_INSTANTIATE(float)
#undef ZELCV_MORPH_INSTANTIATE

// Bits are unpacked to one byte per pixel (0 or 1) into a ring of extended
// rows, combined with the byte kernels (max is OR, min is AND) and packed
// back; destination bits outside the ROI are kept.
void applyBits(bool dilate, const uint8_t* src, int srcStep, int srcBitOffset, uint8_t* dst, int dstStep,
               int dstBitOffset, ZeliSize roi, ZeliBorderType border, const View& v, uint8_t* work) {
  const int W = roi.width, H = roi.height;
  src += srcBitOffset >> 3;
  dst += dstBitOffset >> 3;
  const int so = srcBitOffset & 7, doff = dstBitOffset & 7;
  const int mw = v.maskWidth, mh = v.maskHeight;
  const int ax = v.kind == kEmpty ? 0 : v.anchorX, ay = v.kind == kEmpty ? 0 : v.anchorY;
  const bool top = inMemoryTop(border), bottom = inMemoryBottom(border);
  const bool left = inMemoryLeft(border), right = inMemoryRight(border);
  const int extWidth = W + mw - 1;
  const Slots<uint8_t> ring = makeSlots<uint8_t>(work, extWidth, 1);
  uint8_t* acc = ring[mh];  // W bytes
  bool anyOn = false;
  for (int64_t i = 0; i < int64_t(mw) * mh; ++i) anyOn |= v.mask[i] != 0;

  auto unpack = [&](int r, uint8_t* out) {
    const int rr = ((r < 0 && top) || (r >= H && bottom)) ? r : clampInt(r, 0, H - 1);
    const uint8_t* row = src + int64_t(rr) * srcStep;
    for (int p = -ax; p < extWidth - ax; ++p) {
      int q = p;
      if ((p < 0 && !left) || (p >= W && !right)) q = clampInt(p, 0, W - 1);
      out[p + ax] = uint8_t(bitAt(row, int64_t(so) + q));
    }
  };
  int next = -ay;  // next extended row to unpack
  for (int y = 0; y < H; ++y) {
    if (!anyOn) {
      const uint8_t* row = src + int64_t(y) * srcStep;
      for (int x = 0; x < W; ++x) acc[x] = uint8_t(bitAt(row, int64_t(so) + x));
    } else {
      for (; next <= y + mh - 1 - ay; ++next) unpack(next, ring[(next + ay) % mh]);
      bool first = true;
      for (int j = 0; j < mh; ++j) {
        const uint8_t* row = ring[(y + j) % mh] + ax;  // extended row y + j - ay
        for (int i = 0; i < mw; ++i) {
          if (!v.mask[int64_t(j) * mw + i]) continue;
          if (first)
            minmax::combineShifted<uint8_t, minmax::MaxOp<uint8_t>, true>(acc, W, 1, row, row, true, true, i - ax);
          else if (dilate)
            minmax::combineShifted<uint8_t, minmax::MaxOp<uint8_t>, false>(acc, W, 1, row, row, true, true, i - ax);
          else
            minmax::combineShifted<uint8_t, minmax::MinOp<uint8_t>, false>(acc, W, 1, row, row, true, true, i - ax);
          first = false;
        }
      }
    }
    uint8_t* out = dst + int64_t(y) * dstStep;
    for (int x = 0; x < W; ++x) {
      const int p = doff + x;
      const uint8_t bit = uint8_t(0x80 >> (p & 7));
      out[p >> 3] = acc[x] ? uint8_t(out[p >> 3] | bit) : uint8_t(out[p >> 3] & ~bit);
    }
  }
}

}  // namespace morph
}  // namespace zelcv
