// The two exported tolerance-interval functions.
#include <limits>

#include "kelstat.h"

namespace {
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
}

extern "C" {

KELSTAT_API int32_t kel_CalcParametricToleranceInterval(const double*, uint32_t,
                                                        kel_ParametricTIData* tiData) {
    if (tiData == nullptr) return 0;
    tiData->location = tiData->scale = kNaN;
    tiData->lowerLimit = tiData->upperLimit = kNaN;
    tiData->lowerKFactor = tiData->upperKFactor = kNaN;
    tiData->auxiliary[0] = tiData->auxiliary[1] = kNaN;
    return 0;
}

KELSTAT_API int32_t kel_CalcNonParametricToleranceInterval(const double*, uint32_t,
                                                           kel_NonParametricTIData* tiData) {
    if (tiData == nullptr) return 0;
    tiData->lowerLimit = tiData->upperLimit = tiData->achievedConfidence = kNaN;
    return 0;
}

}  // extern "C"
