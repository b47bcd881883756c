// The one loop over the rows of a streaming operation. An operation describes
// a single row (its pointers, a scalar step for one pixel and vector steps for
// whole blocks); the driver owns the iteration: per row, single pixels until
// the written image reaches a 16-byte boundary, then full blocks, then shorter
// vector parts, then the last pixels one by one. Results never depend on where
// the boundary falls, because every pixel gets the same arithmetic in the
// scalar and the vector step.
//
// A row type provides:
//   const W* written() const;        first element of the written row
//   static constexpr int kBlock;     pixels per vector block
//   static constexpr int kPart;      pixels per shorter vector part: divides kBlock
//                                    and spans a multiple of 16 written bytes
//   void one(int x);                 pixel x, ordinary stores
//   template <StoreMode M> void block(int x);   pixels x .. x + kBlock - 1
//   template <StoreMode M> void part(int x);    pixels x .. x + kPart - 1
//   static constexpr int kBlockAlign;   optional: the alignment in bytes that
//                                    block() needs (16 when absent); parts
//                                    run until it is reached. A row with
//                                    kBlockAlign above 16 has 16-byte parts.
// block() and part() run only where written() + x is 16-byte aligned, and
// block() only where it is kBlockAlign-aligned.
#ifndef ZELCV_KERNELS_ROW_DRIVER_H
#define ZELCV_KERNELS_ROW_DRIVER_H

#include <stddef.h>
#include <stdint.h>

#include <type_traits>

#include "kernels/simd.h"

namespace zelcv {

enum class StoreMode {
  Ordinary,   // plain stores: the result stays in the cache
  Streaming,  // non-temporal stores for the aligned part, fenced at the end
};

namespace simd {

// Writes a vector to a 16-byte aligned address in the chosen store mode.
template <StoreMode M, typename V>
inline void put(void* p, typename V::Raw v) {
  if constexpr (M == StoreMode::Streaming)
    V::stream(p, v);
  else
    V::store(p, v);
}

}  // namespace simd

// The alignment a row type's blocks need.
template <typename Row, typename = void>
struct BlockAlignment {
  static constexpr int value = simd::kBytes;
};
template <typename Row>
struct BlockAlignment<Row, std::void_t<decltype(Row::kBlockAlign)>> {
  static constexpr int value = Row::kBlockAlign;
};

// Runs `makeRow(y)` for each of `height` rows of `width` pixels.
template <StoreMode M, typename MakeRow>
inline void driveRows(int width, int height, MakeRow makeRow) {
  for (int y = 0; y < height; ++y) {
    auto row = makeRow(y);
    using Row = decltype(row);
    static_assert(Row::kBlock % Row::kPart == 0, "a block is a whole number of parts");
    static_assert(sizeof(*row.written()) * Row::kPart % simd::kBytes == 0, "parts keep the alignment");
    constexpr int kBlockAlign = BlockAlignment<Row>::value;
    static_assert(kBlockAlign == simd::kBytes || sizeof(*row.written()) * Row::kPart == simd::kBytes,
                  "parts can reach the block alignment");
    const int head = simd::elementsToAlignment(row.written(), width);
    int x = 0;
    for (; x < head; ++x) row.one(x);
    if (head < width) {
      if constexpr (kBlockAlign != simd::kBytes) {
        while (x <= width - Row::kPart && reinterpret_cast<uintptr_t>(row.written() + x) % kBlockAlign != 0) {
          row.template part<M>(x);
          x += Row::kPart;
        }
      }
      for (; x <= width - Row::kBlock; x += Row::kBlock) row.template block<M>(x);
      for (; x <= width - Row::kPart; x += Row::kPart) row.template part<M>(x);
    }
    for (; x < width; ++x) row.one(x);
  }
  // Non-temporal stores are weakly ordered: make them visible before the
  // caller sees the result.
  if constexpr (M == StoreMode::Streaming) simd::storeFence();
}

// The same loop with the store mode chosen at run time.
template <typename MakeRow>
inline void driveRows(StoreMode mode, int width, int height, MakeRow makeRow) {
  if (mode == StoreMode::Streaming)
    driveRows<StoreMode::Streaming>(width, height, makeRow);
  else
    driveRows<StoreMode::Ordinary>(width, height, makeRow);
}

// An image as a kernel sees it: the first element of the region and the step
// in bytes.
template <typename T>
struct Plane {
  T* data;
  int step;
  T* row(int y) const {
    using Byte = typename std::conditional<std::is_const<T>::value, const char, char>::type;
    return reinterpret_cast<T*>(reinterpret_cast<Byte*>(data) + ptrdiff_t(step) * y);
  }
};

template <typename T>
inline Plane<T> plane(T* data, int step) {
  return {data, step};
}

}  // namespace zelcv

#endif  // ZELCV_KERNELS_ROW_DRIVER_H
