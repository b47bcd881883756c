/* Derivative and smoothing filters: Sobel, Scharr, Laplacian, box lowpass,
 * fixed and caller-chosen Gaussians, and Sobel tap generation.
 *
 * Kernels. Every filter is a sum of separable terms: a row kernel R (along a
 * row, x) times a column kernel C (down the columns, y). Taps apply without
 * reversal, centred on the output pixel: for K = 2r + 1 taps
 *     out(x, y) = sum_i sum_j C[i] R[j] src(x - r + j, y - r + i),
 * so tap 0 multiplies the leftmost (topmost) pixel. One-dimensional taps:
 *     smooth3 = 1 2 1          smooth5 = 1 4 6 4 1       scharr3 = 3 10 3
 *     first3  = -1 0 1         first5  = -1 -2 0 2 1
 *     second3 = 1 -2 1         second5 = 1 0 -2 0 1
 * Operation         R (row)        C (column)     meaning, sign
 * SobelVert         first          smooth         d/dx: positive where brightness grows to the right
 * SobelNegVert      -first         smooth         -d/dx: positive where it grows to the left
 * SobelHoriz        smooth         first          d/dy: positive where it grows downwards
 * SobelVertSecond   second         smooth         d2/dx2
 * SobelHorizSecond  smooth         second         d2/dy2
 * SobelCross        first          first          d2/dxdy (positive for brightness growing right and down)
 * ScharrVert        first3         scharr3        d/dx (3x3 only)
 * ScharrHoriz       scharr3        first3         d/dy (3x3 only)
 * Laplacian         second x smooth + smooth x second   d2/dx2 + d2/dy2
 *                   (3x3: 2 0 2 / 0 -8 0 / 2 0 2)
 * Lowpass           1 ... 1        1 ... 1        box mean of 3x3 or 5x5
 * Gauss (32f)       g              g              g3 = 1/4 1/2 1/4, g5 = 1 4 6 4 1 / 16
 * The Canny detector's derivatives are SobelVert / SobelHoriz (and the Scharr
 * pair) computed by the same code.
 *
 * Results.
 * - 8u16s: the exact integer sum (every kernel stays within 16 bits).
 * - 8u8s: the exact sum v scaled by 2^-s and rounded half up,
 *   floor(v / 2^s + 1/2), saturated to -128 .. 127. s is the smallest shift
 *   that brings the largest possible |v| (255 x the sum of the positive taps
 *   of the 2-D kernel) to 127.5 or less:
 *       mask   Horiz/Vert/NegVert  HorizSecond/VertSecond  Cross  Scharr  Laplacian
 *       3x3    3                   4                       2      5       4
 *       5x5    7                   6                       6      -       7
 * - Lowpass 8u: (sum + N/2) / N with N = 9 or 25, the mean rounded to nearest.
 * - 32f (and the Gaussian filter of every type): per term, a row pass
 *   h = the K products R[j] x pixel formed and added in double precision from
 *   j = 0 on, rounded once to float; then a column pass sum_i C[i] x h_i in
 *   single precision from i = 0 on (a multiplication and an addition per tap,
 *   never fused). All K taps take part, zero taps included. The Laplacian adds
 *   its two terms in float, first term first. Lowpass 32f uses R = 1 ... 1
 *   and C = 1/N (float) ... ; the same bits on every processor.
 * - Gaussian 8u/16u: the float result rounded to nearest (ties to even) and
 *   saturated to the type's range; sources are converted to float exactly.
 *
 * Borders. Pixels outside the ROI come from the border type: zelBorderConstant
 * (the border value), zelBorderReplicate, zelBorderWrap, zelBorderMirror,
 * zelBorderMirrorWithEdge, zelBorderInMemory, and the side flags
 * zelBorderInMemTop/Bottom/Left/Right with any kind (that side is read from
 * memory: the caller guarantees r rows or columns there). A pixel beyond both
 * a row end and a column end is found by the vertical rule first (which row
 * stands for it), then by the horizontal rule within that row; with the
 * constant kind the rows above and below are all border value. Any other kind
 * (5, 7 .. 15) gives zelStatusBadBorder (-225).
 *
 * Checks, in order: null pointers (src, dst, state, buffer, the border-value
 * array of 3-channel members) -8; ROI width or height <= 0 -6; steps below
 * the row bytes -14; 16- or 32-bit step not a multiple of the element size
 * -108; mask not zelMaskSize3x3 / zelMaskSize5x5 (Scharr: 3x3 only) -33;
 * border kind -225. Gaussian filter then: a block not built by
 * zeliFilterGaussianInit -17, built for another data type -12, another
 * channel count -53, a ROI wider than the one it was built for -6. Nothing
 * is written on failure. Sources and destinations must not overlap.
 *
 * Work buffers (bytes, W = ROI width, K = 3 or 5 taps; any alignment):
 * - 8-bit sources (8u16s, 8u8s, Lowpass 8u): 5 W + 64.
 * - 32f members (Sobel, Scharr, Laplacian, Lowpass, Gauss): (8K + 8) W + 56K + 120.
 * - Gaussian filter, C channels: C (4K + 8) W + 8 C (K - 1) + 24K + 128,
 *   state: 4K + 48.
 * Queries check: output pointer(s) null -8; ROI -6; mask -33 (Gaussian:
 * data type other than 8u, 16u, 32f -12; channels other than 1, 3 -47;
 * kernel size even or below 3 -33); a size beyond INT_MAX -6.
 *
 * Gaussian taps (zeliFilterGaussianInit): symmetric, K odd >= 3: with
 * x = 1 - K + 2i, t_i = exp(x^2 (-0.125 / sigma^2)) in double, sum = 2 sum of
 * the t_i below the centre + 1, tap i = t_i / sum (a multiplication by
 * 1 / sum), the centre 1 / sum, each rounded to float. sigma <= 0 means
 * sigma = 0.15 K + 0.35, and then K = 3, 5, 7, 9 take the fixed taps
 * (1 2 1)/4, (1 4 6 4 1)/16, (2 7 14 18 14 7 2)/64 and
 * (4 13 30 51 60 51 30 13 4)/256. A NaN
 * or infinite sigma gives -5.
 *
 * GenSobelKernel: the K coefficients of (1 + z)^(K - 1 - order) (z - 1)^order,
 * lowest power first (order 1, K 3: -1 0 1). kernel null -8; K even, below 3
 * or above 17 (16s) / 31 (32f) -33; order < 0 or >= K -5. */
#ifndef ZELCV_FILTERS_H
#define ZELCV_FILTERS_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* A Gaussian filter's taps, built by zeliFilterGaussianInit in caller memory
 * of the size zeliFilterGaussianGetBufferSize reports (any alignment). */
typedef struct ZeliFilterGaussianState ZeliFilterGaussianState;

#define ZELCV_FILTER_8U(name, D)                                                                      \
  ZELCV_API ZelStatus ZELCV_CALL name(const Zel8u* src, int srcStep, D* dst, int dstStep, ZeliSize roiSize, \
                                      int maskSize, ZeliBorderType borderType, Zel8u borderValue, Zel8u* buffer);
#define ZELCV_FILTER_32F(name)                                                                          \
  ZELCV_API ZelStatus ZELCV_CALL name(const Zel32f* src, int srcStep, Zel32f* dst, int dstStep,          \
                                      ZeliSize roiSize, int maskSize, ZeliBorderType borderType,        \
                                      Zel32f borderValue, Zel8u* buffer);
#define ZELCV_FILTER_QUERY(name) \
  ZELCV_API ZelStatus ZELCV_CALL name(ZeliSize roiSize, int maskSize, int* bufferSize);

ZELCV_FILTER_QUERY(zeliFilterSobelHorizGetBufferSize_8u8s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelHorizBorder_8u8s_C1R, Zel8s)
ZELCV_FILTER_QUERY(zeliFilterSobelVertGetBufferSize_8u8s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelVertBorder_8u8s_C1R, Zel8s)

ZELCV_FILTER_QUERY(zeliFilterSobelNegVertGetBufferSize_8u16s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelNegVertBorder_8u16s_C1R, Zel16s)
ZELCV_FILTER_QUERY(zeliFilterSobelNegVertGetBufferSize_8u8s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelNegVertBorder_8u8s_C1R, Zel8s)
ZELCV_FILTER_QUERY(zeliFilterSobelNegVertGetBufferSize_32f_C1R)
ZELCV_FILTER_32F(zeliFilterSobelNegVertBorder_32f_C1R)

ZELCV_FILTER_QUERY(zeliFilterSobelHorizSecondGetBufferSize_8u16s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelHorizSecondBorder_8u16s_C1R, Zel16s)
ZELCV_FILTER_QUERY(zeliFilterSobelHorizSecondGetBufferSize_8u8s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelHorizSecondBorder_8u8s_C1R, Zel8s)
ZELCV_FILTER_QUERY(zeliFilterSobelHorizSecondGetBufferSize_32f_C1R)
ZELCV_FILTER_32F(zeliFilterSobelHorizSecondBorder_32f_C1R)

ZELCV_FILTER_QUERY(zeliFilterSobelVertSecondGetBufferSize_8u16s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelVertSecondBorder_8u16s_C1R, Zel16s)
ZELCV_FILTER_QUERY(zeliFilterSobelVertSecondGetBufferSize_8u8s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelVertSecondBorder_8u8s_C1R, Zel8s)
ZELCV_FILTER_QUERY(zeliFilterSobelVertSecondGetBufferSize_32f_C1R)
ZELCV_FILTER_32F(zeliFilterSobelVertSecondBorder_32f_C1R)

ZELCV_FILTER_QUERY(zeliFilterSobelCrossGetBufferSize_8u16s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelCrossBorder_8u16s_C1R, Zel16s)
ZELCV_FILTER_QUERY(zeliFilterSobelCrossGetBufferSize_8u8s_C1R)
ZELCV_FILTER_8U(zeliFilterSobelCrossBorder_8u8s_C1R, Zel8s)
ZELCV_FILTER_QUERY(zeliFilterSobelCrossGetBufferSize_32f_C1R)
ZELCV_FILTER_32F(zeliFilterSobelCrossBorder_32f_C1R)

ZELCV_FILTER_QUERY(zeliFilterScharrHorizGetBufferSize_8u16s_C1R)
ZELCV_FILTER_8U(zeliFilterScharrHorizBorder_8u16s_C1R, Zel16s)
ZELCV_FILTER_QUERY(zeliFilterScharrHorizGetBufferSize_8u8s_C1R)
ZELCV_FILTER_8U(zeliFilterScharrHorizBorder_8u8s_C1R, Zel8s)
ZELCV_FILTER_QUERY(zeliFilterScharrHorizGetBufferSize_32f_C1R)
ZELCV_FILTER_32F(zeliFilterScharrHorizBorder_32f_C1R)

ZELCV_FILTER_QUERY(zeliFilterScharrVertGetBufferSize_8u16s_C1R)
ZELCV_FILTER_8U(zeliFilterScharrVertBorder_8u16s_C1R, Zel16s)
ZELCV_FILTER_QUERY(zeliFilterScharrVertGetBufferSize_8u8s_C1R)
ZELCV_FILTER_8U(zeliFilterScharrVertBorder_8u8s_C1R, Zel8s)
ZELCV_FILTER_QUERY(zeliFilterScharrVertGetBufferSize_32f_C1R)
ZELCV_FILTER_32F(zeliFilterScharrVertBorder_32f_C1R)

ZELCV_FILTER_QUERY(zeliFilterLaplacianGetBufferSize_8u16s_C1R)
ZELCV_FILTER_8U(zeliFilterLaplacianBorder_8u16s_C1R, Zel16s)
ZELCV_FILTER_QUERY(zeliFilterLaplacianGetBufferSize_8u8s_C1R)
ZELCV_FILTER_8U(zeliFilterLaplacianBorder_8u8s_C1R, Zel8s)
ZELCV_FILTER_QUERY(zeliFilterLaplacianGetBufferSize_32f_C1R)
ZELCV_FILTER_32F(zeliFilterLaplacianBorder_32f_C1R)

ZELCV_FILTER_QUERY(zeliFilterLowpassGetBufferSize_8u_C1R)
ZELCV_FILTER_8U(zeliFilterLowpassBorder_8u_C1R, Zel8u)
ZELCV_FILTER_QUERY(zeliFilterLowpassGetBufferSize_32f_C1R)
ZELCV_FILTER_32F(zeliFilterLowpassBorder_32f_C1R)

ZELCV_FILTER_QUERY(zeliFilterGaussGetBufferSize_32f_C1R)
ZELCV_FILTER_32F(zeliFilterGaussBorder_32f_C1R)

#undef ZELCV_FILTER_8U
#undef ZELCV_FILTER_32F
#undef ZELCV_FILTER_QUERY

/* The Gaussian filter: sizes for the widest ROI the state will serve, then
 * the taps for sigma and kernelSize, then the filter itself. */
ZELCV_API ZelStatus ZELCV_CALL zeliFilterGaussianGetBufferSize(ZeliSize roiSize, int kernelSize, ZelDataType dataType,
                                                               int channels, int* stateSize, int* bufferSize);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterGaussianInit(ZeliSize roiSize, Zel32f sigma, int kernelSize,
                                                      ZelDataType dataType, int channels,
                                                      ZeliFilterGaussianState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterGaussianBorder_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                               ZeliSize roiSize, ZeliBorderType borderType,
                                                               Zel8u borderValue, const ZeliFilterGaussianState* state,
                                                               Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterGaussianBorder_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst, int dstStep,
                                                               ZeliSize roiSize, ZeliBorderType borderType,
                                                               const Zel8u borderValue[3],
                                                               const ZeliFilterGaussianState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterGaussianBorder_16u_C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType, Zel16u borderValue,
                                                                const ZeliFilterGaussianState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterGaussianBorder_16u_C3R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType, const Zel16u borderValue[3],
                                                                const ZeliFilterGaussianState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterGaussianBorder_32f_C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType, Zel32f borderValue,
                                                                const ZeliFilterGaussianState* state, Zel8u* buffer);
ZELCV_API ZelStatus ZELCV_CALL zeliFilterGaussianBorder_32f_C3R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                ZeliBorderType borderType, const Zel32f borderValue[3],
                                                                const ZeliFilterGaussianState* state, Zel8u* buffer);

/* Sobel taps of derivative `order` and odd size kernelSize. */
ZELCV_API ZelStatus ZELCV_CALL zeliGenSobelKernel_16s(Zel16s* kernel, int kernelSize, int order);
ZELCV_API ZelStatus ZELCV_CALL zeliGenSobelKernel_32f(Zel32f* kernel, int kernelSize, int order);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_FILTERS_H */
