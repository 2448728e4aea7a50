// The four exported stem-and-leaf functions: argument checks, then the internals.
#include <cmath>
#include <cstdint>
#include <limits>

#include "kelstat.h"
#include "stemleaf/stemleaf_container.h"
#include "stemleaf/stemleaf_scale.h"

namespace {

// Positions in the column are 32-bit signed inside the display (outlier counts, hinge indexes).
constexpr std::uint32_t kLongestColumn = std::numeric_limits<std::int32_t>::max();

bool isUsableColumn(const double* data, std::uint32_t n) {
    return data != nullptr && n != 0 && n <= kLongestColumn;
}

bool isUsableScale(const kel_StemAndLeafScaleInfo& scale) {
    const double perLine = scale.leavesPerLine;
    return std::isfinite(scale.leafUnit) && scale.leafUnit > 0.0 &&
           (perLine == 1.0 || perLine == 2.0 || perLine == 5.0 || perLine == 10.0);
}

bool holdsADisplay(const kel_StemAndLeaf& container) {
    return container.isComplete != 0 || container.lines != nullptr ||
           container.lowOutliers != nullptr || container.highOutliers != nullptr;
}

}  // namespace

extern "C" {

KELSTAT_API int32_t kel_FindStemAndLeafScaleInfo(const double* data, uint32_t n,
                                                 kel_StemAndLeafScaleInfo* scale) {
    if (!isUsableColumn(data, n) || scale == nullptr) return KEL_STEMLEAF_INVALID_INPUT;
    if (!kelstat::isAscendingWithoutNaN(data, n)) return KEL_STEMLEAF_INVALID_INPUT;
    kelstat::findStemAndLeafScale(data, n, *scale);
    return KEL_OK;
}

KELSTAT_API kel_StemAndLeaf* kel_CreateStemAndLeafContainer(void) {
    auto* container = new kel_StemAndLeaf{};
    container->medianLine = -1;
    return container;
}

KELSTAT_API int32_t kel_RunStemAndLeaf(const double* data, uint32_t n,
                                       const kel_StemAndLeafScaleInfo* scale,
                                       kel_StemAndLeaf* container) {
    if (!isUsableColumn(data, n) || scale == nullptr || container == nullptr) {
        return KEL_STEMLEAF_INVALID_INPUT;
    }
    if (!isUsableScale(*scale) || holdsADisplay(*container)) return KEL_STEMLEAF_INVALID_INPUT;
    return kelstat::runStemAndLeaf(data, n, *scale, *container);
}

KELSTAT_API void kel_DeleteStemAndLeafContainer(kel_StemAndLeaf** container) {
    if (container == nullptr) return;
    kelstat::releaseStemAndLeaf(*container);
    *container = nullptr;
}

}  // extern "C"
