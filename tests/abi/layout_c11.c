/* The public records' layouts as a C11 compiler sees them. */
#include <stddef.h>

#include "kelstat.h"

_Static_assert(sizeof(kel_StemAndLeafScaleInfo) == 56, "scale record size");
_Static_assert(offsetof(kel_StemAndLeafScaleInfo, leafUnit) == 0, "leafUnit");
_Static_assert(offsetof(kel_StemAndLeafScaleInfo, leavesPerLine) == 8, "leavesPerLine");
_Static_assert(offsetof(kel_StemAndLeafScaleInfo, lineCount) == 16, "lineCount");
_Static_assert(offsetof(kel_StemAndLeafScaleInfo, lowValue) == 24, "lowValue");
_Static_assert(offsetof(kel_StemAndLeafScaleInfo, highValue) == 32, "highValue");
_Static_assert(offsetof(kel_StemAndLeafScaleInfo, increment) == 40, "increment");
_Static_assert(offsetof(kel_StemAndLeafScaleInfo, trimOutliers) == 48, "trimOutliers");

_Static_assert(sizeof(kel_StemAndLeafLine) == 24, "line record size");
_Static_assert(offsetof(kel_StemAndLeafLine, depth) == 0, "depth");
_Static_assert(offsetof(kel_StemAndLeafLine, stem) == 4, "stem");
_Static_assert(offsetof(kel_StemAndLeafLine, isPositive) == 8, "isPositive");
_Static_assert(offsetof(kel_StemAndLeafLine, leafCount) == 12, "leafCount");
_Static_assert(offsetof(kel_StemAndLeafLine, leaves) == 16, "leaves");

_Static_assert(sizeof(kel_StemAndLeaf) == 64, "container size");
_Static_assert(offsetof(kel_StemAndLeaf, lineCount) == 0, "lineCount");
_Static_assert(offsetof(kel_StemAndLeaf, lines) == 8, "lines");
_Static_assert(offsetof(kel_StemAndLeaf, lowOutlierCount) == 16, "lowOutlierCount");
_Static_assert(offsetof(kel_StemAndLeaf, lowOutliers) == 24, "lowOutliers");
_Static_assert(offsetof(kel_StemAndLeaf, highOutlierCount) == 32, "highOutlierCount");
_Static_assert(offsetof(kel_StemAndLeaf, highOutliers) == 40, "highOutliers");
_Static_assert(offsetof(kel_StemAndLeaf, leafUnit) == 48, "leafUnit");
_Static_assert(offsetof(kel_StemAndLeaf, medianLine) == 56, "medianLine");
_Static_assert(offsetof(kel_StemAndLeaf, isComplete) == 60, "isComplete");

_Static_assert(sizeof(kel_ConfidenceType) == 4, "confidence type");
_Static_assert(sizeof(kel_ParametricTIData) == 88, "parametric record size");
_Static_assert(offsetof(kel_ParametricTIData, distribution) == 0, "distribution");
_Static_assert(offsetof(kel_ParametricTIData, confidenceType) == 4, "confidenceType");
_Static_assert(offsetof(kel_ParametricTIData, confidenceLevel) == 8, "confidenceLevel");
_Static_assert(offsetof(kel_ParametricTIData, proportion) == 16, "proportion");
_Static_assert(offsetof(kel_ParametricTIData, location) == 24, "location");
_Static_assert(offsetof(kel_ParametricTIData, scale) == 32, "scale");
_Static_assert(offsetof(kel_ParametricTIData, lowerLimit) == 40, "lowerLimit");
_Static_assert(offsetof(kel_ParametricTIData, upperLimit) == 48, "upperLimit");
_Static_assert(offsetof(kel_ParametricTIData, lowerKFactor) == 56, "lowerKFactor");
_Static_assert(offsetof(kel_ParametricTIData, upperKFactor) == 64, "upperKFactor");
_Static_assert(offsetof(kel_ParametricTIData, auxiliary) == 72, "auxiliary");

_Static_assert(sizeof(kel_NonParametricTIData) == 48, "nonparametric record size");
_Static_assert(offsetof(kel_NonParametricTIData, confidenceType) == 0, "confidenceType");
_Static_assert(offsetof(kel_NonParametricTIData, confidenceLevel) == 8, "confidenceLevel");
_Static_assert(offsetof(kel_NonParametricTIData, proportion) == 16, "proportion");
_Static_assert(offsetof(kel_NonParametricTIData, lowerLimit) == 24, "lowerLimit");
_Static_assert(offsetof(kel_NonParametricTIData, upperLimit) == 32, "upperLimit");
_Static_assert(offsetof(kel_NonParametricTIData, achievedConfidence) == 40, "achievedConfidence");

/* Lets the C++ side show that this unit was compiled into the same program. */
size_t kelstat_c_view_of_container_size(void) { return sizeof(kel_StemAndLeaf); }
