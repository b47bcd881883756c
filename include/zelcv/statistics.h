/* zelcv: masked statistics (norms, norms of differences, relative norms,
 * mean, standard deviation, extrema) and sub-pixel and small utilities.
 * Part of the public interface; "zelcv.h" includes every family.
 * docs/statistics.md has the same contract with examples. */
#ifndef ZELCV_STATISTICS_H
#define ZELCV_STATISTICS_H

#include "zelcv/base.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Masked statistics ------------------------------------------------ */
/* Every statistic reads the pixels of the ROI that its mask selects (mask
 * byte non-zero; without M every pixel) in one channel: the only one of a C1
 * image, or channel coi (1, 2 or 3) of an interleaved C3 image (C3C). The
 * results go through pointers, as Zel64f values and ZeliPoint locations.
 *
 * Arithmetic.
 *   Integer data (8u, 8s, 16u): |x|, |x1 - x2|, x and x^2 are exact and
 *   summed exactly in 64-bit integers (exact for any image of fewer than
 *   2^32 pixels, 16u squares included); the sum is rounded once to double.
 *   32f data: the difference x1 - x2 is taken in single precision; values
 *   are widened to double (squares of them are then exact) and summed in
 *   double precision over sixteen lanes: lane k takes, in raster order, the
 *   pixels of the columns x with x mod 16 == k; with t_k = l_k + l_(k+8)
 *   the total is ((t0 + t4) + (t2 + t6)) + ((t1 + t5) + (t3 + t7)). Every
 *   instruction set gives these bits. A NaN pixel makes a sum NaN; the infinity norm
 *   skips NaNs.
 * Results.
 *   Norm_Inf: max |x|; Norm_L1: sum |x|; Norm_L2: sqrt(sum x^2) (double
 *   square root). NormDiff_*: the same of x1 - x2.
 *   NormRel_*: NormDiff / Norm(src2), one double division. A zero divisor
 *   returns the warning zelStatusDivByZero (6) with +infinity when the
 *   dividend is positive (-infinity for a negative one) and the quiet NaN
 *   with bit pattern 0xFFF8000000000000 when both are 0.
 *   Mean: S / n (one double division) with S the sum and n the count of the
 *   selected pixels. Mean_StdDev: that mean m and the population deviation
 *   sqrt(Q / n - m * m), Q the sum of squares, a negative variance giving 0.
 *   MinMaxIndx: the smallest and largest selected value and, for each, the
 *   first pixel holding it in raster order (smallest y, then smallest x),
 *   as {x, y} within the ROI; the reported value is that pixel's value
 *   (so -0.0 or +0.0 as stored). 32f NaNs are never minimum or maximum.
 * Empty selection (a mask of zeros; for MinMaxIndx also a selection of
 *   NaNs only): norms 0, mean 0, deviation 0, NormRel the NaN above with
 *   the warning; MinMaxIndx values 0 and locations {-1, -1}. The status is
 *   0 (except NormRel).
 * Checks, in this order: src (src1, src2), mask or a result pointer null
 * -8; width or height < 1 -6; an image step below width x channels x
 * element size, or the mask step below the width, -14; a 16- or 32-bit
 * image step not a multiple of the element size -108; coi outside 1..3
 * -52. Nothing is written on an error. */

/* Norms of one image. */
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_8u_C1MR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_8s_C1MR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_16u_C1MR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                     int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_32f_C1MR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                     int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_8u_C3CMR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                     int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_8s_C3CMR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                     int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_16u_C3CMR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                      int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_32f_C3CMR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                      int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_8u_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                   Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_16u_C1R(const Zel16u* src, int srcStep, ZeliSize roiSize,
                                                    Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_Inf_32f_C1R(const Zel32f* src, int srcStep, ZeliSize roiSize,
                                                    Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_8u_C1MR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                   int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_8s_C1MR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                   int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_16u_C1MR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_32f_C1MR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_8u_C3CMR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_8s_C3CMR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_16u_C3CMR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                     int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_32f_C3CMR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                     int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_8u_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                  Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_16u_C1R(const Zel16u* src, int srcStep, ZeliSize roiSize,
                                                   Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L1_32f_C1R(const Zel32f* src, int srcStep, ZeliSize roiSize,
                                                   Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_8u_C1MR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                   int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_8s_C1MR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                   int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_16u_C1MR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_32f_C1MR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_8u_C3CMR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_8s_C3CMR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                    int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_16u_C3CMR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                     int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_32f_C3CMR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                     int maskStep, ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_8u_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                  Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_16u_C1R(const Zel16u* src, int srcStep, ZeliSize roiSize,
                                                   Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNorm_L2_32f_C1R(const Zel32f* src, int srcStep, ZeliSize roiSize,
                                                   Zel64f* value);

/* Norms of src1 - src2. */
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_8u_C1MR(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_8s_C1MR(const Zel8s* src1, int src1Step, const Zel8s* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_16u_C1MR(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                         int src2Step, const Zel8u* mask, int maskStep,
                                                         ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_32f_C1MR(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                         int src2Step, const Zel8u* mask, int maskStep,
                                                         ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_8u_C3CMR(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                         int src2Step, const Zel8u* mask, int maskStep,
                                                         ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_8s_C3CMR(const Zel8s* src1, int src1Step, const Zel8s* src2,
                                                         int src2Step, const Zel8u* mask, int maskStep,
                                                         ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_16u_C3CMR(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                          int src2Step, const Zel8u* mask, int maskStep,
                                                          ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_32f_C3CMR(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                          int src2Step, const Zel8u* mask, int maskStep,
                                                          ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_8u_C1R(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                       int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_16u_C1R(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                        int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_Inf_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                        int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_8u_C1MR(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_8s_C1MR(const Zel8s* src1, int src1Step, const Zel8s* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_16u_C1MR(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_32f_C1MR(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_8u_C3CMR(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_8s_C3CMR(const Zel8s* src1, int src1Step, const Zel8s* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_16u_C3CMR(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                         int src2Step, const Zel8u* mask, int maskStep,
                                                         ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_32f_C3CMR(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                         int src2Step, const Zel8u* mask, int maskStep,
                                                         ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_8u_C1R(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                      int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_16u_C1R(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                       int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L1_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                       int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_8u_C1MR(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_8s_C1MR(const Zel8s* src1, int src1Step, const Zel8s* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_16u_C1MR(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_32f_C1MR(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_8u_C3CMR(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_8s_C3CMR(const Zel8s* src1, int src1Step, const Zel8s* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_16u_C3CMR(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                         int src2Step, const Zel8u* mask, int maskStep,
                                                         ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_32f_C3CMR(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                         int src2Step, const Zel8u* mask, int maskStep,
                                                         ZeliSize roiSize, int coi, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_8u_C1R(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                      int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_16u_C1R(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                       int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormDiff_L2_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                       int src2Step, ZeliSize roiSize, Zel64f* value);

/* NormDiff / Norm(src2), see zelStatusDivByZero above. */
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_Inf_8u_C1MR(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_Inf_8s_C1MR(const Zel8s* src1, int src1Step, const Zel8s* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_Inf_16u_C1MR(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_Inf_32f_C1MR(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                        int src2Step, const Zel8u* mask, int maskStep,
                                                        ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_Inf_8u_C1R(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                      int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_Inf_16u_C1R(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                       int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_Inf_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                       int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L1_8u_C1MR(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                      int src2Step, const Zel8u* mask, int maskStep,
                                                      ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L1_8s_C1MR(const Zel8s* src1, int src1Step, const Zel8s* src2,
                                                      int src2Step, const Zel8u* mask, int maskStep,
                                                      ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L1_16u_C1MR(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L1_32f_C1MR(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L1_8u_C1R(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                     int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L1_16u_C1R(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                      int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L1_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                      int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L2_8u_C1MR(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                      int src2Step, const Zel8u* mask, int maskStep,
                                                      ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L2_8s_C1MR(const Zel8s* src1, int src1Step, const Zel8s* src2,
                                                      int src2Step, const Zel8u* mask, int maskStep,
                                                      ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L2_16u_C1MR(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L2_32f_C1MR(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                       int src2Step, const Zel8u* mask, int maskStep,
                                                       ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L2_8u_C1R(const Zel8u* src1, int src1Step, const Zel8u* src2,
                                                     int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L2_16u_C1R(const Zel16u* src1, int src1Step, const Zel16u* src2,
                                                      int src2Step, ZeliSize roiSize, Zel64f* value);
ZELCV_API ZelStatus ZELCV_CALL zeliNormRel_L2_32f_C1R(const Zel32f* src1, int src1Step, const Zel32f* src2,
                                                      int src2Step, ZeliSize roiSize, Zel64f* value);

/* Mean; mean and population standard deviation. */
ZELCV_API ZelStatus ZELCV_CALL zeliMean_8u_C1MR(const Zel8u* src, int srcStep, const Zel8u* mask, int maskStep,
                                                ZeliSize roiSize, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_8s_C1MR(const Zel8s* src, int srcStep, const Zel8u* mask, int maskStep,
                                                ZeliSize roiSize, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_16u_C1MR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                 int maskStep, ZeliSize roiSize, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_32f_C1MR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                 int maskStep, ZeliSize roiSize, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_8u_C3CMR(const Zel8u* src, int srcStep, const Zel8u* mask, int maskStep,
                                                 ZeliSize roiSize, int coi, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_8s_C3CMR(const Zel8s* src, int srcStep, const Zel8u* mask, int maskStep,
                                                 ZeliSize roiSize, int coi, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_16u_C3CMR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                  int maskStep, ZeliSize roiSize, int coi, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_32f_C3CMR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                  int maskStep, ZeliSize roiSize, int coi, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_8u_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_16u_C1R(const Zel16u* src, int srcStep, ZeliSize roiSize, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_32f_C1R(const Zel32f* src, int srcStep, ZeliSize roiSize, Zel64f* mean);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_8u_C1MR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                       int maskStep, ZeliSize roiSize, Zel64f* mean,
                                                       Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_8s_C1MR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                       int maskStep, ZeliSize roiSize, Zel64f* mean,
                                                       Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_16u_C1MR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                        int maskStep, ZeliSize roiSize, Zel64f* mean,
                                                        Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_32f_C1MR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                        int maskStep, ZeliSize roiSize, Zel64f* mean,
                                                        Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_8u_C3CMR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                        int maskStep, ZeliSize roiSize, int coi, Zel64f* mean,
                                                        Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_8s_C3CMR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                        int maskStep, ZeliSize roiSize, int coi, Zel64f* mean,
                                                        Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_16u_C3CMR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                         int maskStep, ZeliSize roiSize, int coi, Zel64f* mean,
                                                         Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_32f_C3CMR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                         int maskStep, ZeliSize roiSize, int coi, Zel64f* mean,
                                                         Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_8u_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                      Zel64f* mean, Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_16u_C1R(const Zel16u* src, int srcStep, ZeliSize roiSize,
                                                       Zel64f* mean, Zel64f* stdDev);
ZELCV_API ZelStatus ZELCV_CALL zeliMean_StdDev_32f_C1R(const Zel32f* src, int srcStep, ZeliSize roiSize,
                                                       Zel64f* mean, Zel64f* stdDev);

/* Extrema and their first locations in raster order. */
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_8u_C1MR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                      int maskStep, ZeliSize roiSize, Zel64f* minVal,
                                                      Zel64f* maxVal, ZeliPoint* minIndex, ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_8s_C1MR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                      int maskStep, ZeliSize roiSize, Zel64f* minVal,
                                                      Zel64f* maxVal, ZeliPoint* minIndex, ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_16u_C1MR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                       int maskStep, ZeliSize roiSize, Zel64f* minVal,
                                                       Zel64f* maxVal, ZeliPoint* minIndex,
                                                       ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_32f_C1MR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                       int maskStep, ZeliSize roiSize, Zel64f* minVal,
                                                       Zel64f* maxVal, ZeliPoint* minIndex,
                                                       ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_8u_C3CMR(const Zel8u* src, int srcStep, const Zel8u* mask,
                                                       int maskStep, ZeliSize roiSize, int coi, Zel64f* minVal,
                                                       Zel64f* maxVal, ZeliPoint* minIndex,
                                                       ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_8s_C3CMR(const Zel8s* src, int srcStep, const Zel8u* mask,
                                                       int maskStep, ZeliSize roiSize, int coi, Zel64f* minVal,
                                                       Zel64f* maxVal, ZeliPoint* minIndex,
                                                       ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_16u_C3CMR(const Zel16u* src, int srcStep, const Zel8u* mask,
                                                        int maskStep, ZeliSize roiSize, int coi, Zel64f* minVal,
                                                        Zel64f* maxVal, ZeliPoint* minIndex,
                                                        ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_32f_C3CMR(const Zel32f* src, int srcStep, const Zel8u* mask,
                                                        int maskStep, ZeliSize roiSize, int coi, Zel64f* minVal,
                                                        Zel64f* maxVal, ZeliPoint* minIndex,
                                                        ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_8u_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                     Zel64f* minVal, Zel64f* maxVal, ZeliPoint* minIndex,
                                                     ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_16u_C1R(const Zel16u* src, int srcStep, ZeliSize roiSize,
                                                      Zel64f* minVal, Zel64f* maxVal, ZeliPoint* minIndex,
                                                      ZeliPoint* maxIndex);
ZELCV_API ZelStatus ZELCV_CALL zeliMinMaxIndx_32f_C1R(const Zel32f* src, int srcStep, ZeliSize roiSize,
                                                      Zel64f* minVal, Zel64f* maxVal, ZeliPoint* minIndex,
                                                      ZeliPoint* maxIndex);

/* ---- Sub-pixel and small utilities ------------------------------------- */
/* CopySubpix: a window of dstRoiSize (w x h) whose first pixel lies at
 * x0 = centre.x - (w - 1) x 0.5, y0 = centre.y - (h - 1) x 0.5 (single
 * precision). With ix = floor(x0), iy = floor(y0), a = x0 - ix, b = y0 - iy
 * and the single-precision weights w00 = (1 - a)(1 - b), w01 = a(1 - b),
 * w10 = (1 - a) b, w11 = a b, window pixel (i, j) is
 *   ((s(ix+i, iy+j) w00 + s(ix+i+1, iy+j) w01) + s(ix+i, iy+j+1) w10)
 *     + s(ix+i+1, iy+j+1) w11
 * in single precision, evaluated in that order, where s(c, r) is the source
 * pixel at column c and row r clamped into srcRoiSize (replicated border).
 * 8u results are rounded to nearest (ties to even); 32f results are stored
 * as computed. Only pixels of srcRoiSize are read.
 * CopySubpixIntersect writes the same window and reports in *inside, in
 * window coordinates, the rectangle of the pixels whose taps of non-zero
 * weight all lie in the source (columns i with 0 <= ix + i and
 * ix + i + (a > 0) <= width - 1, rows likewise with b): the pixels that
 * needed no replicated value. When that rectangle is empty it returns
 * zelStatusOutOfRange (-11) and writes nothing.
 * Checks: src, dst (or inside) null -8; srcRoiSize, then dstRoiSize, with a
 * side < 1 -6; srcStep below srcRoiSize.width x element size, or dstStep
 * below dstRoiSize.width x element size -14; a 16- or 32-bit step not a
 * multiple of its element size -108; a centre coordinate that is not
 * finite -11. */
ZELCV_API ZelStatus ZELCV_CALL zeliCopySubpix_8u_C1R(const Zel8u* src, int srcStep, ZeliSize srcRoiSize, Zel8u* dst,
                                                     int dstStep, ZeliSize dstRoiSize, ZeliPoint_32f centre);
ZELCV_API ZelStatus ZELCV_CALL zeliCopySubpix_8u32f_C1R(const Zel8u* src, int srcStep, ZeliSize srcRoiSize,
                                                        Zel32f* dst, int dstStep, ZeliSize dstRoiSize,
                                                        ZeliPoint_32f centre);
ZELCV_API ZelStatus ZELCV_CALL zeliCopySubpix_16u32f_C1R(const Zel16u* src, int srcStep, ZeliSize srcRoiSize,
                                                         Zel32f* dst, int dstStep, ZeliSize dstRoiSize,
                                                         ZeliPoint_32f centre);
ZELCV_API ZelStatus ZELCV_CALL zeliCopySubpix_32f_C1R(const Zel32f* src, int srcStep, ZeliSize srcRoiSize,
                                                      Zel32f* dst, int dstStep, ZeliSize dstRoiSize,
                                                      ZeliPoint_32f centre);
ZELCV_API ZelStatus ZELCV_CALL zeliCopySubpixIntersect_8u_C1R(const Zel8u* src, int srcStep, ZeliSize srcRoiSize,
                                                              Zel8u* dst, int dstStep, ZeliSize dstRoiSize,
                                                              ZeliPoint_32f centre, ZeliRect* inside);
ZELCV_API ZelStatus ZELCV_CALL zeliCopySubpixIntersect_8u32f_C1R(const Zel8u* src, int srcStep,
                                                                 ZeliSize srcRoiSize, Zel32f* dst, int dstStep,
                                                                 ZeliSize dstRoiSize, ZeliPoint_32f centre,
                                                                 ZeliRect* inside);
ZELCV_API ZelStatus ZELCV_CALL zeliCopySubpixIntersect_16u32f_C1R(const Zel16u* src, int srcStep,
                                                                  ZeliSize srcRoiSize, Zel32f* dst, int dstStep,
                                                                  ZeliSize dstRoiSize, ZeliPoint_32f centre,
                                                                  ZeliRect* inside);
ZELCV_API ZelStatus ZELCV_CALL zeliCopySubpixIntersect_32f_C1R(const Zel32f* src, int srcStep,
                                                               ZeliSize srcRoiSize, Zel32f* dst, int dstStep,
                                                               ZeliSize dstRoiSize, ZeliPoint_32f centre,
                                                               ZeliRect* inside);

/* SampleLine: the pixels of the 8-connected segment from point1 to point2,
 * both ends included, written to dst in that order: max(|dx|, |dy|) + 1
 * pixels (times 3 elements for C3). The longer axis (x when |dx| = |dy|)
 * advances one pixel per step. With D and d the longer and shorter extents,
 * err starts at D - 2d; a step also advances the shorter axis when err < 0
 * before it, and changes err by -2d, plus 2D when the shorter axis
 * advanced. Checks: src or dst null -8; size -6; step -14, -108; a point
 * outside the ROI -11. */
ZELCV_API ZelStatus ZELCV_CALL zeliSampleLine_8u_C1R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                     ZeliPoint point1, ZeliPoint point2, Zel8u* dst);
ZELCV_API ZelStatus ZELCV_CALL zeliSampleLine_8u_C3R(const Zel8u* src, int srcStep, ZeliSize roiSize,
                                                     ZeliPoint point1, ZeliPoint point2, Zel8u* dst);
ZELCV_API ZelStatus ZELCV_CALL zeliSampleLine_32f_C1R(const Zel32f* src, int srcStep, ZeliSize roiSize,
                                                      ZeliPoint point1, ZeliPoint point2, Zel32f* dst);

/* GradientColorToGray: dst = (c[0] s0 + c[1] s1) + c[2] s2 over the three
 * interleaved channels s0, s1, s2, in single precision in that order. 8u and
 * 16u results are rounded to nearest (ties to even) and saturated (a NaN
 * gives 0); 32f results are stored as computed. Any coefficients are taken.
 * Checks: src, dst or coeffs null -8; size -6; steps -14; -108. */
ZELCV_API ZelStatus ZELCV_CALL zeliGradientColorToGray_8u_C3C1R(const Zel8u* src, int srcStep, Zel8u* dst,
                                                                int dstStep, ZeliSize roiSize,
                                                                const Zel32f* coeffs);
ZELCV_API ZelStatus ZELCV_CALL zeliGradientColorToGray_16u_C3C1R(const Zel16u* src, int srcStep, Zel16u* dst,
                                                                 int dstStep, ZeliSize roiSize,
                                                                 const Zel32f* coeffs);
ZELCV_API ZelStatus ZELCV_CALL zeliGradientColorToGray_32f_C3C1R(const Zel32f* src, int srcStep, Zel32f* dst,
                                                                 int dstStep, ZeliSize roiSize,
                                                                 const Zel32f* coeffs);

/* bFastArctan: dst[i] = the angle of the vector (srcX[i], srcY[i]) in
 * degrees, 0 <= angle <= 360 (360 only by rounding just below 0), within
 * 0.01 degrees of the exact value (the largest error, 0.0096, lies on the
 * diagonals). With ax = |x|, ay = |y|:
 * c = ay / (ax + 2^-52) when ax >= ay, else ax / (ay + 2^-52);
 * t = (((p7 c^2 + p5) c^2 + p3) c^2 + p1) c with p1 = 0.9997878412794807,
 * p3 = -0.3258083974640975, p5 = 0.1555786518463281,
 * p7 = -0.04432655554792128, each times 180 / pi, all in single precision;
 * then t = 90 - t when ax < ay, t = 180 - t when x < 0, t = 360 - t when
 * y < 0. (0, 0) gives 0; a NaN gives NaN. Checks: a pointer null -8;
 * length < 1 -6. */
ZELCV_API ZelStatus ZELCV_CALL zelibFastArctan_32f(const Zel32f* srcY, const Zel32f* srcX, Zel32f* dst,
                                                   int length);

/* UpdateMotionHistory: per pixel, mhi = timestamp where the silhouette is
 * non-zero; elsewhere mhi = 0 where mhi < timestamp - duration (that
 * difference in single precision), and unchanged otherwise. Any timestamp
 * and duration are taken. Checks: silhouette or mhi null -8; size -6;
 * steps -14; a 16- or 32-bit step not a multiple of its element size -108. */
ZELCV_API ZelStatus ZELCV_CALL zeliUpdateMotionHistory_8u32f_C1IR(const Zel8u* silhouette, int silhouetteStep,
                                                                  Zel32f* mhi, int mhiStep, ZeliSize roiSize,
                                                                  Zel32f timestamp, Zel32f duration);
ZELCV_API ZelStatus ZELCV_CALL zeliUpdateMotionHistory_16u32f_C1IR(const Zel16u* silhouette, int silhouetteStep,
                                                                   Zel32f* mhi, int mhiStep, ZeliSize roiSize,
                                                                   Zel32f timestamp, Zel32f duration);
ZELCV_API ZelStatus ZELCV_CALL zeliUpdateMotionHistory_32f_C1IR(const Zel32f* silhouette, int silhouetteStep,
                                                                Zel32f* mhi, int mhiStep, ZeliSize roiSize,
                                                                Zel32f timestamp, Zel32f duration);

#ifdef __cplusplus
}
#endif

#endif /* ZELCV_STATISTICS_H */
