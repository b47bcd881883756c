// Flat and compound morphology from random elements: the bytes choose the
// element (size, on elements, anchor), the ROI, the border and the type; the
// states are built the way a caller builds them and every operation runs.
// 8u dilation and erosion are compared with a plain reference.
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "fuzz_input.h"
#include "zelcv.h"

namespace {

using zelfuzz::Input;

// Max (or min) over the on elements around each pixel, edges replicated.
std::vector<uint8_t> reference(bool dilate, const std::vector<uint8_t>& src, int w, int h,
                               const std::vector<uint8_t>& mask, int mw, int mh) {
  std::vector<uint8_t> out(size_t(w) * size_t(h));
  const int ax = (mw - 1) / 2, ay = (mh - 1) / 2;
  bool any = false;
  for (uint8_t m : mask) any = any || m;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      int v = dilate ? 0 : 255;
      for (int j = 0; j < mh; ++j)
        for (int i = 0; i < mw; ++i) {
          if (!mask[size_t(j * mw + i)]) continue;
          int sx = std::min(std::max(x + i - ax, 0), w - 1), sy = std::min(std::max(y + j - ay, 0), h - 1);
          int s = src[size_t(sy * w + sx)];
          v = dilate ? std::max(v, s) : std::min(v, s);
        }
      out[size_t(y * w + x)] = uint8_t(any ? v : src[size_t(y * w + x)]);
    }
  return out;
}

template <typename T, int C>
struct Ops {
  using BorderGetSize = ZelStatus (*)(int, ZeliSize, int*, int*);
  using BorderInit = ZelStatus (*)(int, const Zel8u*, ZeliSize, ZeliMorphState*, Zel8u*);
  using Morph = ZelStatus (*)(const T*, int, T*, int, ZeliSize, ZeliBorderType, T, const ZeliMorphState*, Zel8u*);
  using AdvGetSize = ZelStatus (*)(ZeliSize, ZeliSize, int*, int*);
  using AdvInit = ZelStatus (*)(ZeliSize, Zel8u*, ZeliSize, ZeliMorphAdvState*, Zel8u*);
  using Adv = ZelStatus (*)(const T*, int, T*, int, ZeliSize, ZeliBorderType, T, const ZeliMorphAdvState*, Zel8u*);
  BorderGetSize getSize;
  BorderInit init;
  Morph dilate, erode;
  AdvGetSize advGetSize;
  AdvInit advInit;
  Adv adv[5];
};

// Runs every operation of one type on one random case.
template <typename T, int C>
void runType(const Ops<T, C>& ops, Input& in, std::vector<uint8_t>& mask, int mw, int mh) {
  const int w = in.range(1, 40), h = in.range(1, 24);
  const int pad = in.range(0, 3) * int(sizeof(T));
  const int step = w * C * int(sizeof(T)) + pad;
  // The in-memory border reads up to the element's reach around the ROI:
  // keep that much image around it.
  const int marginX = mw, marginY = mh;
  const int fullStep = (w + 2 * marginX) * C * int(sizeof(T)) + pad;
  std::vector<uint8_t> srcBlock(size_t(fullStep) * size_t(h + 2 * marginY));
  in.fill(srcBlock.data(), srcBlock.size());
  if (sizeof(T) == 4)  // no NaN: keep floats small integers
    for (size_t i = 0; i + 4 <= srcBlock.size(); i += 4) {
      float f = float(srcBlock[i]);
      std::memcpy(&srcBlock[i], &f, 4);
    }
  const T* src = reinterpret_cast<const T*>(srcBlock.data() + size_t(marginY) * size_t(fullStep) +
                                            size_t(marginX) * C * sizeof(T));
  std::vector<uint8_t> dstBlock(size_t(step) * size_t(h) + 64);
  T* dst = reinterpret_cast<T*>(dstBlock.data());
  static const ZeliBorderType borders[] = {1, 6, 0x11, 0x21, 0x41, 0x81, 0x31, 0xF1};
  const ZeliBorderType border = borders[in.range(0, 7)];
  const bool inMemory = (border & 0xF0) || border == 6;
  const int srcStepUsed = inMemory ? fullStep : step;
  if (!inMemory) src = reinterpret_cast<const T*>(srcBlock.data());

  int stateSize = 0, bufferSize = 0;
  const ZeliSize maskSize = {mw, mh};
  if (ops.getSize(w, maskSize, &stateSize, &bufferSize) == zelStatusOk) {
    std::vector<uint8_t> state(size_t(stateSize) + 7), buffer(size_t(bufferSize) + 7);
    auto* st = reinterpret_cast<ZeliMorphState*>(state.data() + in.range(0, 7));
    if (ops.init(w, mask.data(), maskSize, st, nullptr) == zelStatusOk) {
      Zel8u* buf = buffer.data() + in.range(0, 7);
      ops.dilate(src, srcStepUsed, dst, step, {w, h}, border, T(), st, buf);
      ops.erode(src, srcStepUsed, dst, step, {w, h}, border, T(), st, buf);
    }
  }
  int advState = 0, advBuffer = 0;
  if (ops.advGetSize({w, h}, maskSize, &advState, &advBuffer) == zelStatusOk) {
    std::vector<uint8_t> state(size_t(advState) + 7), initBuffer(size_t(advBuffer) + 7), buffer(size_t(advBuffer) + 7);
    auto* st = reinterpret_cast<ZeliMorphAdvState*>(state.data() + in.range(0, 7));
    if (ops.advInit({w, h}, mask.data(), maskSize, st, initBuffer.data() + in.range(0, 7)) == zelStatusOk) {
      Zel8u* buf = buffer.data() + in.range(0, 7);
      for (auto op : ops.adv) op(src, srcStepUsed, dst, step, {w, h}, border, T(), st, buf);
    }
  }
}

#define OPS(T, t)                                                                                          \
  Ops<T, 1> {                                                                                              \
    zeliMorphologyBorderGetSize_##t, zeliMorphologyBorderInit_##t, zeliDilateBorder_##t, zeliErodeBorder_##t, \
        zeliMorphAdvGetSize_##t, zeliMorphAdvInit_##t, {                                                   \
      zeliMorphOpenBorder_##t, zeliMorphCloseBorder_##t, zeliMorphTophatBorder_##t,                        \
          zeliMorphBlackhatBorder_##t, zeliMorphGradientBorder_##t                                          \
    }                                                                                                      \
  }

void checkAgainstReference(Input& in, std::vector<uint8_t>& mask, int mw, int mh) {
  const int w = in.range(1, 40), h = in.range(1, 24);
  std::vector<uint8_t> src(size_t(w) * size_t(h)), dst(src.size());
  in.fill(src.data(), src.size());
  int stateSize = 0, bufferSize = 0;
  if (zeliMorphologyBorderGetSize_8u_C1R(w, {mw, mh}, &stateSize, &bufferSize) != zelStatusOk) return;
  std::vector<uint8_t> state(static_cast<size_t>(stateSize)), buffer(static_cast<size_t>(bufferSize));
  auto* st = reinterpret_cast<ZeliMorphState*>(state.data());
  if (zeliMorphologyBorderInit_8u_C1R(w, mask.data(), {mw, mh}, st, nullptr) != zelStatusOk) abort();
  for (bool dilate : {true, false}) {
    auto op = dilate ? zeliDilateBorder_8u_C1R : zeliErodeBorder_8u_C1R;
    if (op(src.data(), w, dst.data(), w, {w, h}, zelBorderReplicate, 0, st, buffer.data()) != zelStatusOk) abort();
    if (dst != reference(dilate, src, w, h, mask, mw, mh)) abort();
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in(data, size);
  const int mw = in.range(1, 9), mh = in.range(1, 9);
  std::vector<uint8_t> mask(size_t(mw * mh));
  const int density = in.range(0, 255);
  for (uint8_t& m : mask) m = in.byte() <= density;
  switch (in.range(0, 4)) {
    case 0: checkAgainstReference(in, mask, mw, mh); break;
    case 1: runType(OPS(Zel8u, 8u_C1R), in, mask, mw, mh); break;
    case 2: runType(OPS(Zel16u, 16u_C1R), in, mask, mw, mh); break;
    case 3: runType(OPS(Zel16s, 16s_C1R), in, mask, mw, mh); break;
    default: runType(OPS(Zel32f, 32f_C1R), in, mask, mw, mh); break;
  }
  return 0;
}
