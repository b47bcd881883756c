// Entries of the Gaussian 5x5 pyramid pair and their buffer queries.
#include <limits.h>

#include "core/status.h"
#include "filter/pyramid_gauss.h"

namespace zelcv {
namespace {

enum class Direction { Down, Up };

template <Direction D, typename T, int kCh>
ZelStatus runGauss(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roi, Zel8u* buffer) {
  if (ZelStatus s = checkPointers({src, dst, buffer})) return s;
  if (ZelStatus s = checkSize(roi)) return s;
  // The destination's row bytes follow from the source width.
  const int dstWidth = D == Direction::Down ? roi.width / 2 + roi.width % 2 : 0;
  const ImageArg out = image(dst, dstStep, kCh);
  const bool dstTooShort =
      D == Direction::Down ? dstStep < out.rowBytes(dstWidth) : dstStep < 2 * out.rowBytes(roi.width);
  if (srcStep <= 0 || srcStep < image(src, srcStep, kCh).rowBytes(roi.width) || dstStep <= 0 || dstTooShort)
    return zelStatusBadStep;
  if ((srcStep | dstStep) & int(sizeof(T) - 1)) return zelStatusMisalignedStep;
  if (D == Direction::Down)
    pyr::pyrDown<T, kCh>(src, srcStep, dst, dstStep, roi, buffer);
  else
    pyr::pyrUp<T, kCh>(src, srcStep, dst, dstStep, roi, buffer);
  return zelStatusOk;
}

// The two queries differ in the bytes per source element and the rows kept.
ZelStatus gaussBufferSize(int roiWidth, ZelDataType dataType, int channels, int* bufferSize, int bytesPerElement,
                          int rowBlocks) {
  if (!bufferSize) return zelStatusNullPointer;
  if (roiWidth < 1) return zelStatusBadSize;
  if (dataType != zel8u && dataType != zel8s && dataType != zel32f) return zelStatusBadDataType;
  if (channels != 1 && channels != 3) return zelStatusBadChannels;
  const int64_t size = ((int64_t(roiWidth) * bytesPerElement * channels + 15) >> 4) * rowBlocks + 64;
  if (size > INT_MAX) return zelStatusBadSize;
  *bufferSize = int(size);
  return zelStatusOk;
}

}  // namespace
}  // namespace zelcv

using zelcv::Direction;
using zelcv::runGauss;

ZELCV_ENTRY(zeliPyrDownGetBufSize_Gauss5x5)(int roiWidth, ZelDataType dataType, int channels, int* bufferSize) {
  return zelcv::gaussBufferSize(roiWidth, dataType, channels, bufferSize, 4, 96);
}
ZELCV_ENTRY(zeliPyrUpGetBufSize_Gauss5x5)(int roiWidth, ZelDataType dataType, int channels, int* bufferSize) {
  return zelcv::gaussBufferSize(roiWidth, dataType, channels, bufferSize, 8, 48);
}

#define ZELCV_GAUSS_ENTRY(op, dir, suffix, T, ch)                                                       \
  ZELCV_ENTRY(zeli##op##_Gauss5x5_##suffix)(const T* src, int srcStep, T* dst, int dstStep, ZeliSize roiSize, \
                                          Zel8u* buffer) {                                              \
    return runGauss<Direction::dir, T, ch>(src, srcStep, dst, dstStep, roiSize, buffer);                \
  }
ZELCV_GAUSS_ENTRY(PyrDown, Down, 8u_C1R, Zel8u, 1)
ZELCV_GAUSS_ENTRY(PyrDown, Down, 8u_C3R, Zel8u, 3)
ZELCV_GAUSS_ENTRY(PyrDown, Down, 8s_C1R, Zel8s, 1)
ZELCV_GAUSS_ENTRY(PyrDown, Down, 8s_C3R, Zel8s, 3)
ZELCV_GAUSS_ENTRY(PyrDown, Down, 32f_C1R, Zel32f, 1)
ZELCV_GAUSS_ENTRY(PyrDown, Down, 32f_C3R, Zel32f, 3)
ZELCV_GAUSS_ENTRY(PyrUp, Up, 8u_C1R, Zel8u, 1)
ZELCV_GAUSS_ENTRY(PyrUp, Up, 8u_C3R, Zel8u, 3)
ZELCV_GAUSS_ENTRY(PyrUp, Up, 8s_C1R, Zel8s, 1)
ZELCV_GAUSS_ENTRY(PyrUp, Up, 8s_C3R, Zel8s, 3)
ZELCV_GAUSS_ENTRY(PyrUp, Up, 32f_C1R, Zel32f, 1)
ZELCV_GAUSS_ENTRY(PyrUp, Up, 32f_C3R, Zel32f, 3)
#undef ZELCV_GAUSS_ENTRY
