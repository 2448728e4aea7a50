// The public records' layouts as a C++ compiler sees them, matched against the C view.
#include <cstddef>
#include <type_traits>

#include <gtest/gtest.h>

#include "kelstat.h"

extern "C" size_t kelstat_c_view_of_container_size(void);

static_assert(std::is_standard_layout_v<kel_StemAndLeafScaleInfo>);
static_assert(sizeof(kel_StemAndLeafScaleInfo) == 56);
static_assert(offsetof(kel_StemAndLeafScaleInfo, leafUnit) == 0);
static_assert(offsetof(kel_StemAndLeafScaleInfo, leavesPerLine) == 8);
static_assert(offsetof(kel_StemAndLeafScaleInfo, lineCount) == 16);
static_assert(offsetof(kel_StemAndLeafScaleInfo, lowValue) == 24);
static_assert(offsetof(kel_StemAndLeafScaleInfo, highValue) == 32);
static_assert(offsetof(kel_StemAndLeafScaleInfo, increment) == 40);
static_assert(offsetof(kel_StemAndLeafScaleInfo, trimOutliers) == 48);

static_assert(sizeof(kel_StemAndLeafLine) == 24);
static_assert(offsetof(kel_StemAndLeafLine, depth) == 0);
static_assert(offsetof(kel_StemAndLeafLine, stem) == 4);
static_assert(offsetof(kel_StemAndLeafLine, isPositive) == 8);
static_assert(offsetof(kel_StemAndLeafLine, leafCount) == 12);
static_assert(offsetof(kel_StemAndLeafLine, leaves) == 16);

static_assert(sizeof(kel_StemAndLeaf) == 64);
static_assert(offsetof(kel_StemAndLeaf, lineCount) == 0);
static_assert(offsetof(kel_StemAndLeaf, lines) == 8);
static_assert(offsetof(kel_StemAndLeaf, lowOutlierCount) == 16);
static_assert(offsetof(kel_StemAndLeaf, lowOutliers) == 24);
static_assert(offsetof(kel_StemAndLeaf, highOutlierCount) == 32);
static_assert(offsetof(kel_StemAndLeaf, highOutliers) == 40);
static_assert(offsetof(kel_StemAndLeaf, leafUnit) == 48);
static_assert(offsetof(kel_StemAndLeaf, medianLine) == 56);
static_assert(offsetof(kel_StemAndLeaf, isComplete) == 60);

static_assert(std::is_same_v<kel_ConfidenceType, int32_t>);
static_assert(kel_LowerBound == -1 && kel_TwoSided == 0 && kel_UpperBound == 1);
static_assert(sizeof(kel_ParametricTIData) == 88);
static_assert(offsetof(kel_ParametricTIData, distribution) == 0);
static_assert(offsetof(kel_ParametricTIData, confidenceType) == 4);
static_assert(offsetof(kel_ParametricTIData, confidenceLevel) == 8);
static_assert(offsetof(kel_ParametricTIData, proportion) == 16);
static_assert(offsetof(kel_ParametricTIData, location) == 24);
static_assert(offsetof(kel_ParametricTIData, scale) == 32);
static_assert(offsetof(kel_ParametricTIData, lowerLimit) == 40);
static_assert(offsetof(kel_ParametricTIData, upperLimit) == 48);
static_assert(offsetof(kel_ParametricTIData, lowerKFactor) == 56);
static_assert(offsetof(kel_ParametricTIData, upperKFactor) == 64);
static_assert(offsetof(kel_ParametricTIData, auxiliary) == 72);

static_assert(sizeof(kel_NonParametricTIData) == 48);
static_assert(offsetof(kel_NonParametricTIData, confidenceType) == 0);
static_assert(offsetof(kel_NonParametricTIData, confidenceLevel) == 8);
static_assert(offsetof(kel_NonParametricTIData, proportion) == 16);
static_assert(offsetof(kel_NonParametricTIData, lowerLimit) == 24);
static_assert(offsetof(kel_NonParametricTIData, upperLimit) == 32);
static_assert(offsetof(kel_NonParametricTIData, achievedConfidence) == 40);

TEST(Layout, CAndCppAgree) { EXPECT_EQ(kelstat_c_view_of_container_size(), sizeof(kel_StemAndLeaf)); }
