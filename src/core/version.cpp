#include "core/status.h"

namespace {

const ZelLibraryVersion kVersion = {
    8, 2, 1, 44077, {'k', '4', '\0', '\0'}, "zelCV SSE2 (k4)", "8.2.1 (r44077)", "Oct  9 2014",
};

}  // namespace

ZELCV_ENTRY(zelcvGetLibVersion)(void) { return &kVersion; }
