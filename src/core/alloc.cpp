#include "core/alloc.h"

#include "core/status.h"
#include "zelcore.h"

namespace zelcv {

void* allocBytes(int n) { return n <= 0 ? nullptr : zelMalloc(n); }
void* alloc16(int n) { return n <= 0 ? nullptr : zelMalloc(2 * n); }
void* alloc32(int n) { return n <= 0 ? nullptr : zelMalloc(4 * n); }
void release(void* p) { zelFree(p); }

}  // namespace zelcv

// Objects made of one block: morphology states, pyramid records, inpainting
// states.
ZELCV_SHARED_ENTRY(releaseSingleBlock)(void* object) {
  if (!object) return zelStatusNullPointer;
  zelcv::release(object);
  return zelStatusOk;
}

// Pyramid layer states are single blocks too; the twelve layer Free names
// share this routine so that the layer family has one place to change.
ZELCV_SHARED_ENTRY(releasePyramidLayer)(void* state) {
  return zelcvImpl_releaseSingleBlock(state);
}
