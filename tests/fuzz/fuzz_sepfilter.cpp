// The separable row and column pipelines with caller-built structures from
// random bytes: kernel size, taps, anchor, border, divisor and row pointers
// (repeated rows included). Every row is its own exactly sized block, so a
// read past a row's end is a heap overflow that AddressSanitizer reports.
#include <cstdint>
#include <cstring>
#include <memory>
#include <vector>

#include "fuzz_input.h"
#include "zelcv.h"

namespace {

using zelfuzz::Input;

template <typename S, typename D, typename Tap, typename Value, typename Row>
void rowPass(Row row, Input& in, int channels, Value borderValue) {
  const int w = in.range(1, 70), h = in.range(1, 4), k = in.range(1, 9), anchor = in.range(0, k - 1);
  static const ZeliBorderType borders[] = {zelBorderConstant, zelBorderReplicate};
  const ZeliBorderType border = borders[in.range(0, 1)];
  const size_t rowElems = size_t(w) * size_t(channels);
  // One block holding the rows back to back, ending where the last row ends.
  std::vector<S> src(rowElems * size_t(h));
  in.fill(reinterpret_cast<uint8_t*>(src.data()), src.size() * sizeof(S));
  if (sizeof(S) == 4)
    for (S& v : src) v = S(int(reinterpret_cast<uint8_t&>(v)));
  std::vector<Tap> kernel(static_cast<size_t>(k));
  for (Tap& t : kernel) t = Tap(in.range(-8, 8));
  std::vector<std::unique_ptr<D[]>> dstRows;
  std::vector<D*> dst;
  for (int y = 0; y < h; ++y) {
    dstRows.emplace_back(new D[rowElems]);
    dst.push_back(dstRows.back().get());
  }
  int bytes = 0;
  if (zeliFilterRowBorderPipelineGetBufferSize_32f_C1R({w, h}, k, &bytes) != zelStatusOk) return;
  std::vector<Zel8u> buffer(size_t(bytes) * 4 + 64);  // generous: the sizes differ per member
  row(src.data(), int(rowElems * sizeof(S)), dst.data(), ZeliSize{w, h}, kernel.data(), k, anchor, border,
      borderValue, buffer.data() + in.range(0, 15));
}

void columnPass(Input& in) {
  const int w = in.range(1, 70), h = in.range(1, 6), k = in.range(1, 9);
  const int rows = k + h - 1;
  // A few distinct rows, referenced in any order and repeated.
  const int distinct = in.range(1, 4);
  std::vector<std::vector<Zel32f>> store(static_cast<size_t>(distinct), std::vector<Zel32f>(static_cast<size_t>(w)));
  for (auto& r : store)
    for (Zel32f& v : r) v = float(in.byte());
  std::vector<const Zel32f*> src;
  for (int i = 0; i < rows; ++i) src.push_back(store[size_t(in.range(0, distinct - 1))].data());
  std::vector<Zel32f> kernel(static_cast<size_t>(k));
  for (Zel32f& t : kernel) t = float(in.range(-8, 8)) / 4.0f;
  int bytes = 0;
  if (zeliFilterColumnPipelineGetBufferSize_32f_C1R({w, h}, k, &bytes) != zelStatusOk) return;
  std::vector<Zel8u> buffer(size_t(bytes) + 16);
  std::vector<Zel32f> dst(size_t(w) * size_t(h));
  zeliFilterColumnPipeline_32f_C1R(src.data(), dst.data(), w * 4, {w, h}, kernel.data(), k,
                                   buffer.data() + in.range(0, 15));
  std::vector<Zel16s> src16Store(size_t(w) * 3);
  in.fill(reinterpret_cast<uint8_t*>(src16Store.data()), src16Store.size() * 2);
  std::vector<const Zel16s*> src16;
  for (int i = 0; i < rows; ++i) src16.push_back(src16Store.data() + size_t(w) * size_t(in.range(0, 2)));
  std::vector<Zel16s> kernel16(static_cast<size_t>(k));
  for (Zel16s& t : kernel16) t = Zel16s(in.range(-8, 8));
  std::vector<Zel8u> dst8(size_t(w) * size_t(h));
  if (zeliFilterColumnPipelineGetBufferSize_16s8u_C1R({w, h}, k, &bytes) != zelStatusOk) return;
  std::vector<Zel8u> buffer16(size_t(bytes) + 16);
  zeliFilterColumnPipeline_16s8u_C1R(src16.data(), dst8.data(), w, {w, h}, kernel16.data(), k, in.range(1, 9),
                                     buffer16.data() + in.range(0, 15));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input in(data, size);
  const Zel32f bv32[3] = {1, 2, 3};
  const Zel16s bv16[3] = {1, 2, 3};
  const Zel8u bv8[3] = {1, 2, 3};
  switch (in.range(0, 6)) {
    case 0: rowPass<Zel32f, Zel32f, Zel32f>(
                [](const Zel32f* s, int ss, Zel32f** d, ZeliSize r, const Zel32f* k, int ks, int a, ZeliBorderType b,
                   Zel32f v, Zel8u* buf) { zeliFilterRowBorderPipeline_32f_C1R(s, ss, d, r, k, ks, a, b, v, buf); },
                in, 1, Zel32f(7));
      break;
    case 1: rowPass<Zel32f, Zel32f, Zel32f>(
                [](const Zel32f* s, int ss, Zel32f** d, ZeliSize r, const Zel32f* k, int ks, int a, ZeliBorderType b,
                   const Zel32f* v, Zel8u* buf) { zeliFilterRowBorderPipeline_32f_C3R(s, ss, d, r, k, ks, a, b, v, buf); },
                in, 3, bv32);
      break;
    case 2: rowPass<Zel16s, Zel16s, Zel16s>(
                [&in](const Zel16s* s, int ss, Zel16s** d, ZeliSize r, const Zel16s* k, int ks, int a,
                      ZeliBorderType b, Zel16s v, Zel8u* buf) {
                  zeliFilterRowBorderPipeline_16s_C1R(s, ss, d, r, k, ks, a, b, v, in.range(1, 9), buf);
                },
                in, 1, Zel16s(7));
      break;
    case 3: rowPass<Zel16s, Zel16s, Zel16s>(
                [&in](const Zel16s* s, int ss, Zel16s** d, ZeliSize r, const Zel16s* k, int ks, int a,
                      ZeliBorderType b, const Zel16s* v, Zel8u* buf) {
                  zeliFilterRowBorderPipeline_Low_16s_C3R(s, ss, d, r, k, ks, a, b, v, in.range(1, 9), buf);
                },
                in, 3, bv16);
      break;
    case 4: rowPass<Zel8u, Zel16s, Zel16s>(
                [&in](const Zel8u* s, int ss, Zel16s** d, ZeliSize r, const Zel16s* k, int ks, int a,
                      ZeliBorderType b, const Zel8u* v, Zel8u* buf) {
                  zeliFilterRowBorderPipeline_8u16s_C3R(s, ss, d, r, k, ks, a, b, v, in.range(1, 9), buf);
                },
                in, 3, bv8);
      break;
    default: columnPass(in); break;
  }
  return 0;
}
