/* zelcv: Compound morphology: opening, closing, top-hat, black-hat, gradient.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_MORPH_ADV_H
#define ZELCV_MORPH_ADV_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Compound morphology: opening, closing, top-hat, black-hat, gradient - */
/* Compositions of the newer dilation/erosion above with the mask of Init and
 * its reflection through the centre. MorphAdvGetSize: stateSize = 2 S + 32,
 * bufferSize = R (h + mh - 1) + 2 B, S and B the MorphologyBorderGetSize sizes
 * for roiSize.width, R the bytes of a row widened by mw - 1 pixels rounded up
 * to 32 (1u: one byte per pixel). MorphAdvInit reflects the caller's mask in
 * place and restores it before returning (the mask must be writable); the
 * state keeps a pointer into the buffer given to Init (the gradient's
 * intermediate image), so that buffer must stay valid while the state is
 * used, and a gradient call must not run concurrently with another call
 * passing that same buffer. MorphAdvInitAlloc takes the caller's anchor for the
 * mask (the reflected anchor for the reflection); its state is released by
 * MorphAdvFree. Processing calls accept zelBorderReplicate with any in-memory
 * side flags or zelBorderInMemory (which reads mh - 1 rows and mw - 1 columns
 * around the ROI); borderValue is never read. An ROI wider than the Init
 * width, or one whose intermediate image does not fit the Init size, gives
 * -6. Opening and closing accept src == dst; top-hat, black-hat and gradient
 * refuse it (-9997); other overlaps are not supported.
 * Top-hat is src - opening, black-hat closing - src, gradient dilation -
 * erosion: saturating at 0 for 8u and 16u, to the 16-bit range for 16s, and
 * for 32f a float subtraction clamped below at 0 (NaN gives 0). 1u: pixels as
 * in flat morphology; a difference pixel is set where the first operand is set
 * and the second is clear. */
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvFree(ZeliMorphAdvState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvGetSize_8u_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                          int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInit_8u_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                                       ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInitAlloc_8u_C1R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                            Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphOpenBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                          int dstStep, ZeliSize roiSize,
                                                          ZeliBorderType borderType, Zel8u borderValue,
                                                          const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphCloseBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                           int dstStep, ZeliSize roiSize,
                                                           ZeliBorderType borderType, Zel8u borderValue,
                                                           const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphTophatBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                            int dstStep, ZeliSize roiSize,
                                                            ZeliBorderType borderType, Zel8u borderValue,
                                                            const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphBlackhatBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                              int dstStep, ZeliSize roiSize,
                                                              ZeliBorderType borderType, Zel8u borderValue,
                                                              const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGradientBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                              int dstStep, ZeliSize roiSize,
                                                              ZeliBorderType borderType, Zel8u borderValue,
                                                              const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvGetSize_8u_C3R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                          int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInit_8u_C3R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                                       ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInitAlloc_8u_C3R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                            Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphOpenBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                          int dstStep, ZeliSize roiSize,
                                                          ZeliBorderType borderType,
                                                          const Zel8u borderValue[3],
                                                          const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphCloseBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                           int dstStep, ZeliSize roiSize,
                                                           ZeliBorderType borderType,
                                                           const Zel8u borderValue[3],
                                                           const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphTophatBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                            int dstStep, ZeliSize roiSize,
                                                            ZeliBorderType borderType,
                                                            const Zel8u borderValue[3],
                                                            const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphBlackhatBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                              int dstStep, ZeliSize roiSize,
                                                              ZeliBorderType borderType,
                                                              const Zel8u borderValue[3],
                                                              const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGradientBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                              int dstStep, ZeliSize roiSize,
                                                              ZeliBorderType borderType,
                                                              const Zel8u borderValue[3],
                                                              const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvGetSize_8u_C4R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                          int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInit_8u_C4R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                                       ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInitAlloc_8u_C4R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                            Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphOpenBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                          int dstStep, ZeliSize roiSize,
                                                          ZeliBorderType borderType,
                                                          const Zel8u borderValue[4],
                                                          const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphCloseBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                           int dstStep, ZeliSize roiSize,
                                                           ZeliBorderType borderType,
                                                           const Zel8u borderValue[4],
                                                           const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphTophatBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                            int dstStep, ZeliSize roiSize,
                                                            ZeliBorderType borderType,
                                                            const Zel8u borderValue[4],
                                                            const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphBlackhatBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                              int dstStep, ZeliSize roiSize,
                                                              ZeliBorderType borderType,
                                                              const Zel8u borderValue[4],
                                                              const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGradientBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                              int dstStep, ZeliSize roiSize,
                                                              ZeliBorderType borderType,
                                                              const Zel8u borderValue[4],
                                                              const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvGetSize_32f_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                           int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInit_32f_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                                        ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInitAlloc_32f_C1R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                             Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphOpenBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                           int dstStep, ZeliSize roiSize,
                                                           ZeliBorderType borderType, Zel32f borderValue,
                                                           const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphCloseBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                            int dstStep, ZeliSize roiSize,
                                                            ZeliBorderType borderType, Zel32f borderValue,
                                                            const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphTophatBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                             int dstStep, ZeliSize roiSize,
                                                             ZeliBorderType borderType, Zel32f borderValue,
                                                             const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphBlackhatBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType, Zel32f borderValue,
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGradientBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType, Zel32f borderValue,
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvGetSize_32f_C3R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                           int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInit_32f_C3R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                                        ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInitAlloc_32f_C3R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                             Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphOpenBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                           int dstStep, ZeliSize roiSize,
                                                           ZeliBorderType borderType,
                                                           const Zel32f borderValue[3],
                                                           const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphCloseBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                            int dstStep, ZeliSize roiSize,
                                                            ZeliBorderType borderType,
                                                            const Zel32f borderValue[3],
                                                            const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphTophatBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                             int dstStep, ZeliSize roiSize,
                                                             ZeliBorderType borderType,
                                                             const Zel32f borderValue[3],
                                                             const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphBlackhatBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType,
                                                               const Zel32f borderValue[3],
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGradientBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType,
                                                               const Zel32f borderValue[3],
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvGetSize_32f_C4R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                           int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInit_32f_C4R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                                        ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInitAlloc_32f_C4R(ZeliMorphAdvState** stateOut, ZeliSize roiSize,
                                                             Zel8u* mask, ZeliSize maskSize, ZeliPoint anchor);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphOpenBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                           int dstStep, ZeliSize roiSize,
                                                           ZeliBorderType borderType,
                                                           const Zel32f borderValue[4],
                                                           const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphCloseBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                            int dstStep, ZeliSize roiSize,
                                                            ZeliBorderType borderType,
                                                            const Zel32f borderValue[4],
                                                            const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphTophatBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                             int dstStep, ZeliSize roiSize,
                                                             ZeliBorderType borderType,
                                                             const Zel32f borderValue[4],
                                                             const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphBlackhatBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType,
                                                               const Zel32f borderValue[4],
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGradientBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType,
                                                               const Zel32f borderValue[4],
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvGetSize_16u_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                           int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInit_16u_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                                        ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphOpenBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                           int dstStep, ZeliSize roiSize,
                                                           ZeliBorderType borderType, Zel16u borderValue,
                                                           const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphCloseBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                            int dstStep, ZeliSize roiSize,
                                                            ZeliBorderType borderType, Zel16u borderValue,
                                                            const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphTophatBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                             int dstStep, ZeliSize roiSize,
                                                             ZeliBorderType borderType, Zel16u borderValue,
                                                             const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphBlackhatBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType, Zel16u borderValue,
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGradientBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType, Zel16u borderValue,
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvGetSize_16s_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                           int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInit_16s_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                                        ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphOpenBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                           int dstStep, ZeliSize roiSize,
                                                           ZeliBorderType borderType, Zel16s borderValue,
                                                           const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphCloseBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                            int dstStep, ZeliSize roiSize,
                                                            ZeliBorderType borderType, Zel16s borderValue,
                                                            const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphTophatBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                             int dstStep, ZeliSize roiSize,
                                                             ZeliBorderType borderType, Zel16s borderValue,
                                                             const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphBlackhatBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType, Zel16s borderValue,
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGradientBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType, Zel16s borderValue,
                                                               const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvGetSize_1u_C1R(ZeliSize roiSize, ZeliSize maskSize, int* stateSize,
                                                          int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphAdvInit_1u_C1R(ZeliSize roiSize, Zel8u* mask, ZeliSize maskSize,
                                                       ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphOpenBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                          Zel8u* dst, int dstStep, int dstBitOffset,
                                                          ZeliSize roiSize, ZeliBorderType borderType,
                                                          Zel8u borderValue, const ZeliMorphAdvState* state,
                                                          Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphCloseBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                           Zel8u* dst, int dstStep, int dstBitOffset,
                                                           ZeliSize roiSize, ZeliBorderType borderType,
                                                           Zel8u borderValue, const ZeliMorphAdvState* state,
                                                           Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphTophatBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                            Zel8u* dst, int dstStep, int dstBitOffset,
                                                            ZeliSize roiSize, ZeliBorderType borderType,
                                                            Zel8u borderValue, const ZeliMorphAdvState* state,
                                                            Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphBlackhatBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                              Zel8u* dst, int dstStep, int dstBitOffset,
                                                              ZeliSize roiSize, ZeliBorderType borderType,
                                                              Zel8u borderValue,
                                                              const ZeliMorphAdvState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphGradientBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                              Zel8u* dst, int dstStep, int dstBitOffset,
                                                              ZeliSize roiSize, ZeliBorderType borderType,
                                                              Zel8u borderValue,
                                                              const ZeliMorphAdvState* state, Zel8u* buffer);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_MORPH_ADV_H */
