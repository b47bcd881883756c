/* zelcv: computer-vision image primitives with a C interface.
 *
 * Images belong to the caller and are passed as a pointer to the first pixel
 * of the region of interest (ROI), a row step in bytes and the ROI size.
 * Every function returns a ZelStatus: 0 on success, a negative error code
 * (nothing was written) or a positive warning. Nothing is thrown or logged and
 * the library keeps no global state.
 */
#ifndef ZELCV_H
#define ZELCV_H

/* One header per family; this one includes them all. */
#include "zelcv/base.h"
#include "zelcv/accumulate.h"
#include "zelcv/sepfilter.h"
#include "zelcv/canny.h"
#include "zelcv/morphology.h"
#include "zelcv/morph_adv.h"
#include "zelcv/gray_morphology.h"
#include "zelcv/integral.h"
#include "zelcv/floodfill.h"
#include "zelcv/pyramid.h"
#include "zelcv/distance.h"
#include "zelcv/filters.h"
#include "zelcv/statistics.h"
#include "zelcv/undistort.h"
#include "zelcv/optflow.h"
#include "zelcv/segmentation.h"
#include "zelcv/haar.h"
#include "zelcv/background.h"
#include "zelcv/features.h"

#endif /* ZELCV_H */
