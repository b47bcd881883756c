/* zelcv: Flat morphology: min/max filters, dilation and erosion.
 * Part of the public interface; "zelcv.h" includes every family. */
#ifndef ZELCV_MORPHOLOGY_H
#define ZELCV_MORPHOLOGY_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Flat morphology: min/max filters, dilation, erosion -------------- */
/* The element (mask) is maskSize.width x maskSize.height bytes without row
 * padding; non-zero bytes are on. Dilation writes the maximum over the on
 * elements placed with the anchor on the output pixel, erosion the minimum.
 * 32f: -0.0 and +0.0 compare equal and either may be returned; NaN inputs
 * give unspecified results.
 *
 * Max/Min filters: solid rectangle, replicated border; buffer of the size
 * the matching GetBufferSize reports (Min and Max share one size rule).
 * Older interface: MorphologyInit/InitAlloc (caller's anchor) builds a state
 * that also holds the work memory; DilateBorderReplicate/ErodeBorderReplicate
 * accept borderType 1 only (-5 otherwise). A state of the older interface
 * must not serve two calls at once.
 * Newer interface: MorphologyBorderInit (centre anchor) into caller memory,
 * plus a separate work buffer per call; DilateBorder/ErodeBorder accept
 * zelBorderReplicate with any in-memory side flags, or zelBorderInMemory;
 * borderValue is never read. BorderInit does not use its buffer argument (it
 * may be null). 8u and 32f accept src == dst (the same image and step);
 * other overlaps are not supported. 16u, 16s and 1u refuse src == dst (-9997).
 * States are placed at the start of the caller's block at any alignment;
 * copying a built state elsewhere is not supported. Sizes that do not fit in
 * 32 bits give zelStatusBadSize.
 * 1u images: pixels are bits, the pixel at bit offset 0 is the most
 * significant bit of its byte; a bit offset of 8 or more advances the row
 * pointer by whole bytes. Bits of the destination bytes outside the ROI are
 * kept. Dilation is OR, erosion AND over the on elements. */
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   ZeliSize maskSize, ZeliPoint anchor,
                                                                   Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   ZeliSize maskSize, ZeliPoint anchor,
                                                                   Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   ZeliSize maskSize, ZeliPoint anchor,
                                                                   Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxBorderReplicate_32f_C1R(const Zel32f* src, int srcStep,
                                                                    Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                                    ZeliSize maskSize, ZeliPoint anchor,
                                                                    Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxBorderReplicate_32f_C3R(const Zel32f* src, int srcStep,
                                                                    Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                                    ZeliSize maskSize, ZeliPoint anchor,
                                                                    Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxBorderReplicate_32f_C4R(const Zel32f* src, int srcStep,
                                                                    Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                                    ZeliSize maskSize, ZeliPoint anchor,
                                                                    Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   ZeliSize maskSize, ZeliPoint anchor,
                                                                   Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   ZeliSize maskSize, ZeliPoint anchor,
                                                                   Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                   int dstStep, ZeliSize roiSize,
                                                                   ZeliSize maskSize, ZeliPoint anchor,
                                                                   Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinBorderReplicate_32f_C1R(const Zel32f* src, int srcStep,
                                                                    Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                                    ZeliSize maskSize, ZeliPoint anchor,
                                                                    Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinBorderReplicate_32f_C3R(const Zel32f* src, int srcStep,
                                                                    Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                                    ZeliSize maskSize, ZeliPoint anchor,
                                                                    Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinBorderReplicate_32f_C4R(const Zel32f* src, int srcStep,
                                                                    Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                                    ZeliSize maskSize, ZeliPoint anchor,
                                                                    Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxGetBufferSize_8u_C1R(int roiWidth, ZeliSize maskSize,
                                                                 int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxGetBufferSize_8u_C3R(int roiWidth, ZeliSize maskSize,
                                                                 int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxGetBufferSize_8u_C4R(int roiWidth, ZeliSize maskSize,
                                                                 int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxGetBufferSize_32f_C1R(int roiWidth, ZeliSize maskSize,
                                                                  int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxGetBufferSize_32f_C3R(int roiWidth, ZeliSize maskSize,
                                                                  int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMaxGetBufferSize_32f_C4R(int roiWidth, ZeliSize maskSize,
                                                                  int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinGetBufferSize_8u_C1R(int roiWidth, ZeliSize maskSize,
                                                                 int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinGetBufferSize_8u_C3R(int roiWidth, ZeliSize maskSize,
                                                                 int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinGetBufferSize_8u_C4R(int roiWidth, ZeliSize maskSize,
                                                                 int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinGetBufferSize_32f_C1R(int roiWidth, ZeliSize maskSize,
                                                                  int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinGetBufferSize_32f_C3R(int roiWidth, ZeliSize maskSize,
                                                                  int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterMinGetBufferSize_32f_C4R(int roiWidth, ZeliSize maskSize,
                                                                  int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyGetSize_8u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                            int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInit_8u_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                         ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInitAlloc_8u_C1R(int roiWidth, const Zel8u* mask,
                                                              ZeliSize maskSize, ZeliPoint anchor,
                                                              ZeliMorphState** stateOut);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyGetSize_8u_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                            int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInit_8u_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                         ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInitAlloc_8u_C3R(int roiWidth, const Zel8u* mask,
                                                              ZeliSize maskSize, ZeliPoint anchor,
                                                              ZeliMorphState** stateOut);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyGetSize_8u_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                            int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInit_8u_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                         ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInitAlloc_8u_C4R(int roiWidth, const Zel8u* mask,
                                                              ZeliSize maskSize, ZeliPoint anchor,
                                                              ZeliMorphState** stateOut);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyGetSize_32f_C1R(int roiWidth, const Zel8u* mask,
                                                             ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInit_32f_C1R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                          ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInitAlloc_32f_C1R(int roiWidth, const Zel8u* mask,
                                                               ZeliSize maskSize, ZeliPoint anchor,
                                                               ZeliMorphState** stateOut);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyGetSize_32f_C3R(int roiWidth, const Zel8u* mask,
                                                             ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInit_32f_C3R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                          ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInitAlloc_32f_C3R(int roiWidth, const Zel8u* mask,
                                                               ZeliSize maskSize, ZeliPoint anchor,
                                                               ZeliMorphState** stateOut);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyGetSize_32f_C4R(int roiWidth, const Zel8u* mask,
                                                             ZeliSize maskSize, int* stateSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInit_32f_C4R(int roiWidth, const Zel8u* mask, ZeliSize maskSize,
                                                          ZeliPoint anchor, ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyInitAlloc_32f_C4R(int roiWidth, const Zel8u* mask,
                                                               ZeliSize maskSize, ZeliPoint anchor,
                                                               ZeliMorphState** stateOut);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType,
                                                                ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType,
                                                                ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType,
                                                                ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorderReplicate_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                                 int dstStep, ZeliSize roiSize,
                                                                 ZeliBorderType borderType,
                                                                 ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorderReplicate_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                                 int dstStep, ZeliSize roiSize,
                                                                 ZeliBorderType borderType,
                                                                 ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorderReplicate_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                                 int dstStep, ZeliSize roiSize,
                                                                 ZeliBorderType borderType,
                                                                 ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorderReplicate_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType,
                                                               ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorderReplicate_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType,
                                                               ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorderReplicate_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                               int dstStep, ZeliSize roiSize,
                                                               ZeliBorderType borderType,
                                                               ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorderReplicate_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType,
                                                                ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorderReplicate_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType,
                                                                ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorderReplicate_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType,
                                                                ZeliMorphState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderGetSize_8u_C1R(int roiWidth, ZeliSize maskSize,
                                                                  int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderInit_8u_C1R(int roiWidth, const Zel8u* mask,
                                                               ZeliSize maskSize, ZeliMorphState* state,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderGetSize_8u_C3R(int roiWidth, ZeliSize maskSize,
                                                                  int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderInit_8u_C3R(int roiWidth, const Zel8u* mask,
                                                               ZeliSize maskSize, ZeliMorphState* state,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderGetSize_8u_C4R(int roiWidth, ZeliSize maskSize,
                                                                  int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderInit_8u_C4R(int roiWidth, const Zel8u* mask,
                                                               ZeliSize maskSize, ZeliMorphState* state,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderGetSize_32f_C1R(int roiWidth, ZeliSize maskSize,
                                                                   int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderInit_32f_C1R(int roiWidth, const Zel8u* mask,
                                                                ZeliSize maskSize, ZeliMorphState* state,
                                                                Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderGetSize_32f_C3R(int roiWidth, ZeliSize maskSize,
                                                                   int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderInit_32f_C3R(int roiWidth, const Zel8u* mask,
                                                                ZeliSize maskSize, ZeliMorphState* state,
                                                                Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderGetSize_32f_C4R(int roiWidth, ZeliSize maskSize,
                                                                   int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderInit_32f_C4R(int roiWidth, const Zel8u* mask,
                                                                ZeliSize maskSize, ZeliMorphState* state,
                                                                Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderGetSize_16u_C1R(int roiWidth, ZeliSize maskSize,
                                                                   int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderInit_16u_C1R(int roiWidth, const Zel8u* mask,
                                                                ZeliSize maskSize, ZeliMorphState* state,
                                                                Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderGetSize_16s_C1R(int roiWidth, ZeliSize maskSize,
                                                                   int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderInit_16s_C1R(int roiWidth, const Zel8u* mask,
                                                                ZeliSize maskSize, ZeliMorphState* state,
                                                                Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderGetSize_1u_C1R(int roiWidth, ZeliSize maskSize,
                                                                  int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliMorphologyBorderInit_1u_C1R(int roiWidth, const Zel8u* mask,
                                                               ZeliSize maskSize, ZeliMorphState* state,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                       ZeliSize roiSize, ZeliBorderType borderType,
                                                       Zel8u borderValue, const ZeliMorphState* state,
                                                       Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                       ZeliSize roiSize, ZeliBorderType borderType,
                                                       const Zel8u borderValue[3], const ZeliMorphState* state,
                                                       Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                       ZeliSize roiSize, ZeliBorderType borderType,
                                                       const Zel8u borderValue[4], const ZeliMorphState* state,
                                                       Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliBorderType borderType, Zel32f borderValue,
                                                        const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliBorderType borderType, const Zel32f borderValue[3],
                                                        const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliBorderType borderType, const Zel32f borderValue[4],
                                                        const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliBorderType borderType, Zel16u borderValue,
                                                        const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                        int dstStep, ZeliSize roiSize,
                                                        ZeliBorderType borderType, Zel16s borderValue,
                                                        const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliDilateBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                       Zel8u* dst, int dstStep, int dstBitOffset,
                                                       ZeliSize roiSize, ZeliBorderType borderType,
                                                       Zel8u borderValue, const ZeliMorphState* state,
                                                       Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                      ZeliSize roiSize, ZeliBorderType borderType,
                                                      Zel8u borderValue, const ZeliMorphState* state,
                                                      Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                      ZeliSize roiSize, ZeliBorderType borderType,
                                                      const Zel8u borderValue[3], const ZeliMorphState* state,
                                                      Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorder_8u_C4R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                      ZeliSize roiSize, ZeliBorderType borderType,
                                                      const Zel8u borderValue[4], const ZeliMorphState* state,
                                                      Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                       int dstStep, ZeliSize roiSize,
                                                       ZeliBorderType borderType, Zel32f borderValue,
                                                       const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                       int dstStep, ZeliSize roiSize,
                                                       ZeliBorderType borderType, const Zel32f borderValue[3],
                                                       const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorder_32f_C4R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                       int dstStep, ZeliSize roiSize,
                                                       ZeliBorderType borderType, const Zel32f borderValue[4],
                                                       const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                       int dstStep, ZeliSize roiSize,
                                                       ZeliBorderType borderType, Zel16u borderValue,
                                                       const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorder_16s_C1R(const Zel16s* src, int srcStep, Zel16s* dst,
                                                       int dstStep, ZeliSize roiSize,
                                                       ZeliBorderType borderType, Zel16s borderValue,
                                                       const ZeliMorphState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliErodeBorder_1u_C1R(const Zel8u* src, int srcStep, int srcBitOffset,
                                                      Zel8u* dst, int dstStep, int dstBitOffset,
                                                      ZeliSize roiSize, ZeliBorderType borderType,
                                                      Zel8u borderValue, const ZeliMorphState* state,
                                                      Zel8u* buffer);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_MORPHOLOGY_H */
