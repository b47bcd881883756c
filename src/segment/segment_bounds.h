// The row step of boundary marking, exposed so that the unit tests can hold
// the vector form against the plain one.
#ifndef ZELCV_SEGMENT_SEGMENT_BOUNDS_H
#define ZELCV_SEGMENT_SEGMENT_BOUNDS_H

namespace zelcv {
namespace bounds {

// Marks, in place, the pixels of `row` that differ from their right
// neighbour or from `below` (the next row, null for the last; with conn8
// also its diagonals).
template <typename T, bool kVector>
void markRow(T* row, const T* below, int w, T val, bool conn8);

}  // namespace bounds
}  // namespace zelcv

#endif  // ZELCV_SEGMENT_SEGMENT_BOUNDS_H
