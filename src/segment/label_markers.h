// Internal entry points of the run-based labelling, exposed so that the unit
// tests can hold the vector scan against the plain one.
#ifndef ZELCV_SEGMENT_LABEL_MARKERS_H
#define ZELCV_SEGMENT_LABEL_MARKERS_H

#include <stdint.h>

#include "segment/label_runs.h"

namespace zelcv {
namespace runs {

// Cuts every row into runs of equal non-zero value and unites the runs that
// touch a run of the same value in the row above (8- or 4-connected).
// Returns the number of runs.
template <typename T, bool kVector>
int32_t findEqualRuns(const T* src, int srcStep, int w, int h, bool conn8, const Layout& l);

// Replaces every run's parent by -(label + 1), numbering the regions in the
// order of their first run from minLabel, later ones clamped to maxLabel.
// Returns the number of regions.
int64_t resolveLabels(Run* r, int32_t n, int64_t minLabel, int64_t maxLabel);

}  // namespace runs
}  // namespace zelcv

#endif  // ZELCV_SEGMENT_LABEL_MARKERS_H
