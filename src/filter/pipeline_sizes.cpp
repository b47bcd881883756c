// Work-buffer sizes of the separable pipeline. The row sizes depend on the
// kernel size only (the buffer holds the prepared taps and one extended row
// end), the column sizes on the width only; each includes 32 bytes of slack
// for aligning the buffer start.
#include <limits.h>
#include <stdint.h>

#include "core/alloc.h"
#include "core/status.h"

namespace zelcv {
namespace {

// Row sizes: perKernel x kernelSize + constant.
ZelStatus rowSize(ZeliSize roi, int kernelSize, int* bufferSize, int64_t perKernel, int64_t constant) {
  if (!bufferSize) return zelStatusNullPointer;
  if (roi.width < 1 || roi.height < 1 || kernelSize < 1) return zelStatusBadSize;
  const int64_t bytes = perKernel * kernelSize + constant;
  if (bytes > INT_MAX) return zelStatusBadSize;  // not representable: refuse rather than wrap
  *bufferSize = static_cast<int>(bytes);
  return zelStatusOk;
}

// Column sizes: perColumn x (width rounded up to `columns`) + constant.
ZelStatus columnSize(ZeliSize roi, int kernelSize, int* bufferSize, int64_t perColumn, int64_t columns,
                     int64_t constant) {
  return rowSize(roi, kernelSize, bufferSize, 0, perColumn * alignSize(roi.width, columns) + constant);
}

}  // namespace
}  // namespace zelcv

#define ZELCV_ROW_SIZE(suffix, perKernel, constant)                                              \
  ZELCV_ENTRY(zeliFilterRowBorderPipelineGetBufferSize_##suffix)(ZeliSize roiSize, int kernelSize, \
                                                                 int* bufferSize) {              \
    return zelcv::rowSize(roiSize, kernelSize, bufferSize, perKernel, constant);                \
  }
ZELCV_ROW_SIZE(16s_C1R, 48, 112)
ZELCV_ROW_SIZE(16s_C3R, 40, 96)
ZELCV_ROW_SIZE(16u_C1R, 48, 80)
ZELCV_ROW_SIZE(16u_C3R, 112, 80)
ZELCV_ROW_SIZE(32f_C1R, 64, 96)
ZELCV_ROW_SIZE(32f_C3R, 192, 64)
ZELCV_ROW_SIZE(8u16s_C1R, 36, 144)
ZELCV_ROW_SIZE(8u16s_C3R, 60, 144)
ZELCV_ROW_SIZE(Low_16s_C1R, 24, 96)
ZELCV_ROW_SIZE(Low_16s_C3R, 208, 96)

// The column queries come in alias groups: one implementation per formula.
ZELCV_SHARED_ENTRY(filterColumnBufferSize16s_C1)(ZeliSize roiSize, int kernelSize, int* bufferSize) {
  return zelcv::columnSize(roiSize, kernelSize, bufferSize, 12, 4, 64);
}
ZELCV_SHARED_ENTRY(filterColumnBufferSize16s_C3)(ZeliSize roiSize, int kernelSize, int* bufferSize) {
  return zelcv::columnSize(roiSize, kernelSize, bufferSize, 36, 4, 64);
}
ZELCV_SHARED_ENTRY(filterColumnBufferSizeConstant)(ZeliSize roiSize, int kernelSize, int* bufferSize) {
  return zelcv::columnSize(roiSize, kernelSize, bufferSize, 0, 1, 32);
}
ZELCV_ENTRY(zeliFilterColumnPipelineGetBufferSize_Low_16s_C1R)(ZeliSize roiSize, int kernelSize, int* bufferSize) {
  return zelcv::columnSize(roiSize, kernelSize, bufferSize, 12, 8, 64);
}
ZELCV_ENTRY(zeliFilterColumnPipelineGetBufferSize_Low_16s_C3R)(ZeliSize roiSize, int kernelSize, int* bufferSize) {
  return zelcv::columnSize(roiSize, kernelSize, bufferSize, 36, 8, 64);
}
