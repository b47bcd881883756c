/* zelcv: foreground detection (histogram and Gaussian models), the
 * Gaussian-mixture background model and super-resolution by steepest descent.
 * Part of the public interface; "zelcv.h" includes every family.
 * docs/background.md has the same contract with worked examples. */
#ifndef ZELCV_BACKGROUND_H
#define ZELCV_BACKGROUND_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Common rules ------------------------------------------------------ */
/* A model is built for one frame size and kept by the caller; every later
 * call passes a ROI of exactly that size (another size gives -6, after the
 * step checks). A state of another kind or channel count gives -17.
 * Foreground masks are one byte per pixel: 255 foreground, 0 background.
 * The C1 and C3 forms of the histogram and Gaussian models follow the same
 * rules: a C3 model keeps its state per channel of the interleaved pixels
 * and a pixel is foreground when any of its channels is; the rules below
 * are per pixel and channel.
 * Checks: null pointers -8 (images, then the state), ROI size -6, steps -14
 * (32f steps not a multiple of 4: -108), the state's kind -17, the ROI
 * against the model -6, then the parameters -7. Nothing is written on failure.
 * An InitAlloc failure returns -9 and leaves *state untouched. The models
 * take no mask: a caller that wants to keep objects out of a model updates
 * only with frames it trusts. */

typedef struct ZeliFGHistogramState ZeliFGHistogramState;
typedef struct ZeliFGGaussianState ZeliFGGaussianState;
typedef struct ZeliFGMMState ZeliFGMMState;
typedef struct ZeliSRHNState ZeliSRHNState;

/* ---- Histogram foreground model ---------------------------------------- */
/* Each pixel and channel keeps 16 counts (8-bit), one per bin of 16 grey
 * levels: bin b = value >> 4. 16 bytes per pixel and channel.
 * InitAlloc: every count 0 except the first frame's bin, set to initCount.
 * Update, per pixel and channel with b the new value's bin: if count[b] is
 * 255, every count of that pixel and channel is halved first (c >> 1); then
 * count[b] += 1. Old values thus fade by halves as new ones arrive.
 * Detection: total = sum of the 16 counts (never 0). The channel is
 * background when count[b] * 65536 >= thresholdQ16 * total (unsigned 32-bit,
 * exact), with thresholdQ16 = max(1, floor(threshold * 65536 + 0.5)) taken in
 * double precision at InitAlloc; otherwise it is foreground. Detection does
 * not change the model.
 * Parameters (NULL for the defaults): threshold in (0, 1], default 0.05;
 * initCount 1..255, default 32. Out of range or NaN: -7. */
typedef struct {
  Zel32f threshold;
  int32_t initCount;
} ZeliFGHistogramParams;

ZELCV_API ZelStatus ZELCV_CALL zeliForegroundHistogramInitAlloc_8u_C1R(const Zel8u* src, int srcStep,
                                                                       ZeliSize roiSize,
                                                                       ZeliFGHistogramState** state,
                                                                       const ZeliFGHistogramParams* params);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundHistogramInitAlloc_8u_C3R(const Zel8u* src, int srcStep,
                                                                       ZeliSize roiSize,
                                                                       ZeliFGHistogramState** state,
                                                                       const ZeliFGHistogramParams* params);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundHistogramFree_8u_C1R(ZeliFGHistogramState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundHistogramFree_8u_C3R(ZeliFGHistogramState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundHistogram_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                              int dstStep, ZeliSize roiSize,
                                                              const ZeliFGHistogramState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundHistogram_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                              int dstStep, ZeliSize roiSize,
                                                              const ZeliFGHistogramState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundHistogramUpdate_8u_C1R(const Zel8u* src, int srcStep,
                                                                    ZeliSize roiSize,
                                                                    ZeliFGHistogramState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundHistogramUpdate_8u_C3R(const Zel8u* src, int srcStep,
                                                                    ZeliSize roiSize,
                                                                    ZeliFGHistogramState* state);

/* ---- Gaussian foreground model ----------------------------------------- */
/* Each pixel and channel keeps a mean m and a variance v (single precision,
 * 8 bytes per pixel and channel). Every operation below is one rounded
 * single-precision operation, in the order written (no fused multiply-add).
 * InitAlloc: m = value, v = initVariance.
 * Detection: d = value - m; the channel is foreground when d * d > k2 * v,
 * with k2 = k * k computed once at InitAlloc. Detection does not change the
 * model.
 * Update: d = value - m; m = m + alpha * d; v = v + alpha * (d * d - v);
 * then v = max(v, minVariance).
 * Parameters (NULL for the defaults): alpha (learning rate) in (0, 1],
 * default 0.01; k > 0, default 2.5; initVariance > 0, default 225 (15^2);
 * minVariance > 0, default 4. Out of range, infinite or NaN: -7. */
typedef struct {
  Zel32f alpha;
  Zel32f k;
  Zel32f initVariance;
  Zel32f minVariance;
} ZeliFGGaussianParams;

ZELCV_API ZelStatus ZELCV_CALL zeliForegroundGaussianInitAlloc_8u_C1R(const Zel8u* src, int srcStep,
                                                                      ZeliSize roiSize,
                                                                      ZeliFGGaussianState** state,
                                                                      const ZeliFGGaussianParams* params);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundGaussianInitAlloc_8u_C3R(const Zel8u* src, int srcStep,
                                                                      ZeliSize roiSize,
                                                                      ZeliFGGaussianState** state,
                                                                      const ZeliFGGaussianParams* params);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundGaussianFree_8u_C1R(ZeliFGGaussianState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundGaussianFree_8u_C3R(ZeliFGGaussianState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundGaussian_8u_C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                             int dstStep, ZeliSize roiSize,
                                                             const ZeliFGGaussianState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundGaussian_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                             int dstStep, ZeliSize roiSize,
                                                             const ZeliFGGaussianState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundGaussianUpdate_8u_C1R(const Zel8u* src, int srcStep,
                                                                   ZeliSize roiSize,
                                                                   ZeliFGGaussianState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliForegroundGaussianUpdate_8u_C3R(const Zel8u* src, int srcStep,
                                                                   ZeliSize roiSize,
                                                                   ZeliFGGaussianState* state);

/* ---- Gaussian-mixture background model --------------------------------- */
/* Each pixel keeps K components (K = numComponents, 1..8), each a weight w,
 * a colour mean u (3 values) and one variance v shared by the channels; all
 * single precision, every operation one rounded single-precision operation
 * in the order written (no fused multiply-add). A component with w == 0 is
 * unused. Init makes every component unused and the frame count n = 0.
 * Per frame n and pixel x = (x0, x1, x2), with a = max(alpha, 1 / (2n + 2))
 * (so the first frames learn fast), b = 1 - a, c = a * complexity:
 * 1. For every k: e_j = x_j - u_kj, D_k = (e_0 * e_0 + e_1 * e_1) + e_2 * e_2.
 * 2. Foreground rule (on the model before this frame): the pixel is
 *    background when some used k has D_k < varThreshold * v_k and
 *    R_k < backgroundRatio, where R_k sums, in index order, the weights of
 *    the components ranked before k (w_j > w_k, or w_j == w_k and j < k).
 *    Otherwise it is foreground. There is no shadow class.
 * 3. Match: among used k with D_k < varThresholdGen * v_k, the one of
 *    largest weight (ties: lowest index), if any.
 * 4. Weights: t = ((w_k * b) - c) + (k matched ? a : 0); w_k = t > 0 ? t : 0.
 * 5. The matched component: r = min(a / w_k, 1) with its new weight;
 *    u_kj = u_kj + r * e_j; v_k = min(max(v_k + r * (D_k - v_k), varMin), varMax).
 *    No match: the component of smallest new weight (ties: lowest index)
 *    becomes w = a, u = x, v = varInit.
 * 6. s = sum of the weights in index order; every w_k = w_k / s.
 * Then n = n + 1 (it stops growing at 2^30).
 * Background image: the mean of the heaviest component (ties: lowest
 * index), each channel rounded as floor(u + 0.5) and clamped to 0..255; 0
 * where no component is used (before the first frame).
 * Parameters (NULL for the defaults): alpha in (0, 1], default 0.002;
 * varThreshold > 0, default 16; varThresholdGen > 0, default 9;
 * backgroundRatio in (0, 1], default 0.9; varInit, varMin, varMax with
 * 0 < varMin <= varInit <= varMax, defaults 15, 4, 75; complexity in [0, 1),
 * default 0.05. Out of range or NaN: -7.
 * Memory: GetBufferSize reports the bytes of the state for a ROI (about
 * 20 x K bytes per pixel); Init builds it in any caller block of that size
 * at any address. numComponents outside 1..8: -7; a state larger than
 * INT_MAX bytes: -6. */
typedef struct {
  Zel32f alpha;
  Zel32f varThreshold;
  Zel32f varThresholdGen;
  Zel32f backgroundRatio;
  Zel32f varInit;
  Zel32f varMin;
  Zel32f varMax;
  Zel32f complexity;
} ZeliFGMMParams;

ZELCV_API ZelStatus ZELCV_CALL zeliFGMMGetBufferSize_8u_C3R(ZeliSize roiSize, int numComponents, int* size);
ZELCV_API ZelStatus ZELCV_CALL zeliFGMMInit_8u_C3R(ZeliSize roiSize, int numComponents,
                                                   const ZeliFGMMParams* params, ZeliFGMMState* state);
/* Writes the foreground mask of src and then updates the model with it. */
ZELCV_API ZelStatus ZELCV_CALL zeliFGMMForeground_8u_C3R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                         int dstStep, ZeliSize roiSize, ZeliFGMMState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliFGMMBackground_8u_C3R(Zel8u* dst, int dstStep, ZeliSize roiSize,
                                                         const ZeliFGMMState* state);

/* ---- Super-resolution (steepest descent on a high-resolution estimate) -- */
/* The state holds a P x P point-spread function (P = 2 or 3, taps in row
 * order) and an integer scale s (1..8). A low-resolution frame with
 * integer offset (ox, oy), in high-resolution pixels, is modelled as
 *   L(x, y) = sum over j, i of psf[j * P + i] * H(X, Y),
 *   X = clamp(s * x + ox + i, 0, W - 1), Y = clamp(s * y + oy + j, 0, Hh - 1),
 * with W x Hh the high-resolution size (positions outside repeat the edge).
 * CalcResidual writes R(x, y) = src(x, y) - L(x, y) over the low-resolution
 * ROI; the sum starts at 0 and adds psf * H (one product, one addition, each
 * rounded) for j then i ascending.
 * UpdateGradient adds the transpose: for y, x, j, i ascending,
 *   grad(X, Y) = grad(X, Y) + psf[j * P + i] * R(x, y).
 * After a frame set, H + step * grad lowers the squared residual for a step
 * below 2 / (sum of squared taps x frames covering a pixel).
 * InitAlloc: psf non-null with P x P finite taps, scale 1..8 (else -7).
 * The operations take the low-resolution ROI and the high-resolution size;
 * hrSize below 1 gives -6, a state of the other PSF size -17. */
ZELCV_API ZelStatus ZELCV_CALL zeliSRHNInitAlloc_PSF2x2(ZeliSRHNState** state, const Zel32f* psf, int scale);
ZELCV_API ZelStatus ZELCV_CALL zeliSRHNInitAlloc_PSF3x3(ZeliSRHNState** state, const Zel32f* psf, int scale);
ZELCV_API ZelStatus ZELCV_CALL zeliSRHNFree_PSF2x2(ZeliSRHNState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliSRHNFree_PSF3x3(ZeliSRHNState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliSRHNCalcResidual_PSF2x2_8u32f_C1R(const Zel8u* src, int srcStep,
                                                                     const Zel32f* hr, int hrStep,
                                                                     Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                                     ZeliSize hrSize, ZeliPoint offset,
                                                                     const ZeliSRHNState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliSRHNCalcResidual_PSF3x3_8u32f_C1R(const Zel8u* src, int srcStep,
                                                                     const Zel32f* hr, int hrStep,
                                                                     Zel32f* dst, int dstStep, ZeliSize roiSize,
                                                                     ZeliSize hrSize, ZeliPoint offset,
                                                                     const ZeliSRHNState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliSRHNUpdateGradient_PSF2x2_32f_C1R(const Zel32f* src, int srcStep, Zel32f* grad,
                                                                     int gradStep, ZeliSize roiSize,
                                                                     ZeliSize hrSize, ZeliPoint offset,
                                                                     const ZeliSRHNState* state);
ZELCV_API ZelStatus ZELCV_CALL zeliSRHNUpdateGradient_PSF3x3_32f_C1R(const Zel32f* src, int srcStep, Zel32f* grad,
                                                                     int gradStep, ZeliSize roiSize,
                                                                     ZeliSize hrSize, ZeliPoint offset,
                                                                     const ZeliSRHNState* state);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_BACKGROUND_H */
