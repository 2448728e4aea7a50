// Whole displays through the exported functions: the worked displays, the line rules around
// zero, depths with outliers, and what bad input does (and does not) write.
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <limits>
#include <optional>
#include <vector>

#include "kelstat.h"
#include "stemleaf/stemleaf_container.h"
#include "stemleaf_test_support.h"

namespace kelstat {
namespace {

using testing::Display;
using testing::Line;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInf = std::numeric_limits<double>::infinity();
constexpr bool kNeg = false;
constexpr bool kPos = true;

kel_StemAndLeafScaleInfo fixedScale(double leafUnit, double leavesPerLine, double increment = 0) {
    kel_StemAndLeafScaleInfo scale{};
    scale.leafUnit = leafUnit;
    scale.leavesPerLine = leavesPerLine;
    scale.increment = increment;
    return scale;
}

struct DisplayCase {
    const char* name;
    std::vector<double> data;
    bool trim;
    std::optional<kel_StemAndLeafScaleInfo> scale;  // empty: the automatic scale
    Display expected;
};

Display runToDisplay(const std::vector<double>& data, kel_StemAndLeafScaleInfo scale) {
    kel_StemAndLeaf* container = kel_CreateStemAndLeafContainer();
    const auto n = static_cast<std::uint32_t>(data.size());
    EXPECT_EQ(kel_RunStemAndLeaf(data.data(), n, &scale, container), KEL_OK);
    EXPECT_EQ(container->isComplete, 1);
    const Display display = testing::copyDisplay(*container);
    kel_DeleteStemAndLeafContainer(&container);
    EXPECT_EQ(container, nullptr);
    return display;
}

TEST(StemLeafDisplay, WorkedDisplays) {
    const std::vector<double> eleven = {1.2, 2.5, 2.7, 3.1, 3.3, 3.8, 4.0, 4.4, 5.1, 9.9, 15.0};
    const DisplayCase cases[] = {
        {"twelve, one line per stem",
         {-23, -15, -8, -2, 0, 3, 7, 12, 18, 25, 31, 44},
         false,
         {},
         {{{1, -2, kNeg, {3}},
           {2, -1, kNeg, {5}},
           {4, 0, kNeg, {8, 2}},
           {3, 0, kPos, {0, 3, 7}},
           {5, 1, kPos, {2, 8}},
           {3, 2, kPos, {5}},
           {2, 3, kPos, {1}},
           {1, 4, kPos, {4}}},
          {},
          {},
          1,
          3}},
        {"two lines per stem across zero",
         {-20, -12, -5, 3, 9},
         false,
         {},
         {{{1, -2, kNeg, {0}},
           {1, -1, kNeg, {}},
           {2, -1, kNeg, {2}},
           {1, 0, kNeg, {5}},
           {2, 0, kNeg, {}},
           {2, 0, kPos, {3}},
           {1, 0, kPos, {9}}},
          {},
          {},
          1,
          3}},
        {"ending at zero, median between lines",
         {-3, -2, -1, 0},
         false,
         {},
         {{{1, -3, kNeg, {0}},
           {2, -2, kNeg, {0}},
           {2, -1, kNeg, {0}},
           {1, 0, kNeg, {}},
           {1, 0, kPos, {0}}},
          {},
          {},
          0.1,
          -1}},
        {"empty middle line",
         {1, 2, 11, 12},
         false,
         {},
         {{{2, 0, kPos, {1, 2}}, {2, 0, kPos, {}}, {2, 1, kPos, {1, 2}}}, {}, {}, 1, -1}},
        {"all leaves 0 gives one line per stem",
         {50, 50, 50},
         false,
         fixedScale(1, 2),
         {{{3, 5, kPos, {0, 0, 0}}}, {}, {}, 1, 0}},
        {"six zeros",
         std::vector<double>(6, 0.0),
         false,
         fixedScale(1, 1),
         {{{6, 0, kPos, {0, 0, 0, 0, 0, 0}}, {0, 1, kPos, {}}}, {}, {}, 1, 0}},
        {"high outliers trimmed",
         eleven,
         true,
         {},
         {{{1, 1, kPos, {2}},
           {1, 1, kPos, {}},
           {1, 2, kPos, {}},
           {3, 2, kPos, {5, 7}},
           {5, 3, kPos, {1, 3}},
           {1, 3, kPos, {8}},
           {5, 4, kPos, {0, 4}},
           {3, 4, kPos, {}},
           {3, 5, kPos, {1}}},
          {},
          {99, 150},
          0.1,
          5}},
        {"low outlier counts toward the depths",
         {-50, 1, 2, 3, 4, 5, 6, 7, 8},
         true,
         {},
         {{{2, 1, kPos, {0}},
           {3, 2, kPos, {0}},
           {4, 3, kPos, {0}},
           {1, 4, kPos, {0}},
           {4, 5, kPos, {0}},
           {3, 6, kPos, {0}},
           {2, 7, kPos, {0}},
           {1, 8, kPos, {0}}},
          {-500},
          {},
          0.1,
          3}},
        {"trimming ignored for two values",
         {1, 100},
         true,
         {},
         {{{1, 0, kPos, {0}}, {1, 1, kPos, {0}}}, {}, {}, 10, -1}},
        {"below zero within a leaf unit starts on the +0 line",
         {-0.5, 3, 7},
         false,
         fixedScale(1, 10),
         {{{3, 0, kPos, {0, 3, 7}}, {0, 1, kPos, {}}}, {}, {}, 1, 0}},
        {"-0 line takes negatives with quotient 0",
         {-1.5, -0.5, 2},
         false,
         fixedScale(1, 10),
         {{{2, 0, kNeg, {1, 0}}, {1, 0, kPos, {2}}}, {}, {}, 1, 0}},
        {"one leaf unit per line around zero",
         {-1, 0},
         false,
         fixedScale(1, 1),
         {{{1, 0, kNeg, {1}}, {1, 0, kNeg, {}}, {1, 0, kPos, {0}}}, {}, {}, 1, -1}},
        {"negative zero is not below zero",
         {-0.0, -0.0, 0.0},
         false,
         fixedScale(1, 1),
         {{{3, 0, kPos, {0, 0, 0}}, {0, 1, kPos, {}}}, {}, {}, 1, 0}},
    };
    for (const DisplayCase& c : cases) {
        SCOPED_TRACE(c.name);
        kel_StemAndLeafScaleInfo scale{};
        if (c.scale) {
            scale = *c.scale;
        } else {
            scale.trimOutliers = c.trim ? 1 : 0;
            ASSERT_EQ(kel_FindStemAndLeafScaleInfo(
                          c.data.data(), static_cast<std::uint32_t>(c.data.size()), &scale),
                      KEL_OK);
        }
        scale.trimOutliers = c.trim ? 1 : 0;
        EXPECT_EQ(runToDisplay(c.data, scale), c.expected);
    }
}

TEST(StemLeafDisplay, RequestedIncrementKeepsItsWidth) {
    // All quotients are multiples of 10, but a requested increment keeps five lines per stem.
    const std::vector<double> data = {50, 60};
    EXPECT_EQ(runToDisplay(data, fixedScale(1, 2, 2)).lines.size(), 6u);
    EXPECT_EQ(runToDisplay(data, fixedScale(1, 2, 0)).lines.size(), 2u);
}

TEST(StemLeafDisplay, DepthsWithoutAMedianLine) {
    // Upward pass skipped (half not above the low outliers) and downward pass skipped.
    kel_StemAndLeaf container{};
    kel_StemAndLeafLine lines[2] = {};
    lines[0].leafCount = 1;
    lines[1].leafCount = 1;
    container.lines = lines;
    container.lineCount = 2;
    container.lowOutlierCount = 3;
    container.medianLine = -1;
    computeCountsToMedian(container);
    EXPECT_EQ(container.medianLine, -1);
    EXPECT_EQ(lines[0].depth, 2);  // downward only: 1, then 2
    EXPECT_EQ(lines[1].depth, 1);

    lines[0].depth = lines[1].depth = 0;
    container.lowOutlierCount = 0;
    container.highOutlierCount = 5;
    computeCountsToMedian(container);
    EXPECT_EQ(container.medianLine, -1);
    EXPECT_EQ(lines[0].depth, 1);  // upward only: 1, 2
    EXPECT_EQ(lines[1].depth, 2);
}

TEST(StemLeafDisplay, OutliersCopyTheirRange) {
    const double column[] = {-0.7, 0.1, 0.2, 0.3, 9.0};
    const LeafQuotients values{column, 0.1};
    kel_StemAndLeaf container{};
    getOutliers(values, 0, -1, false, container);
    EXPECT_EQ(container.lowOutliers, nullptr);
    getOutliers(values, 3, 4, true, container);
    ASSERT_EQ(container.highOutlierCount, 2);
    EXPECT_EQ(container.highOutliers[0], 3);
    EXPECT_EQ(container.highOutliers[1], 90);
    delete[] container.highOutliers;
}

TEST(StemLeafDisplay, FindDepthStopsAtTheFirstValueThatDoesNotBelong) {
    // Quotients -3, -1, 0, 0, 0, 0, 2, 9, 10, 10, 25: negative values of quotient 0 around zero.
    const double column[] = {-3, -1, -0.7, -0.2, 0, 0.4, 2, 9, 10, 10, 25};
    const LeafQuotients quotients{column, 1.0};
    const struct {
        std::int64_t from, edge;
        bool negativeSide;
        std::int64_t expected;
    } cases[] = {
        {0, -1, true, 2},     {0, -3, true, 1},  {0, -4, true, 0},  {2, 0, true, 4},
        {2, 0, false, 2},     {2, 10, false, 8}, {7, 10, false, 8}, {0, 100, false, 11},
        {11, 100, false, 11}, {4, 2, false, 6},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(findDepth(quotients, c.from, 11, c.edge, c.negativeSide), c.expected)
            << "from " << c.from << " edge " << c.edge;
    }
}

// A container holding a known sentinel in every byte, to see that a refused call wrote nothing.
kel_StemAndLeaf sentinelContainer() {
    kel_StemAndLeaf container;
    std::memset(&container, 0, sizeof container);
    container.leafUnit = 42.0;
    container.medianLine = -1;
    return container;
}

TEST(StemLeafBadInput, RefusedRunsWriteNothing) {
    const double sorted[] = {1, 2, 3};
    const double unsorted[] = {1, 3, 2};
    const double withNaN[] = {1, kNaN, 3};
    // Out of order in ways that would otherwise end the run early.
    const double saturatedUnsorted[] = {3e9, 1, 2};
    const double tooManyLinesUnsorted[] = {0, 5, 1, 2e7};
    const double descending[] = {5, 1};
    const kel_StemAndLeafScaleInfo good = fixedScale(1, 1);
    const struct {
        const char* name;
        const double* data;
        std::uint32_t n;
        kel_StemAndLeafScaleInfo scale;
    } cases[] = {
        {"null data", nullptr, 3, good},
        {"n = 0", sorted, 0, good},
        {"unsorted", unsorted, 3, good},
        {"NaN", withNaN, 3, good},
        {"saturated end, unsorted", saturatedUnsorted, 3, good},
        {"too many lines, unsorted", tooManyLinesUnsorted, 4, fixedScale(1, 1, 1)},
        {"descending", descending, 2, good},
        {"leaf unit 0", sorted, 3, fixedScale(0, 1)},
        {"negative leaf unit", sorted, 3, fixedScale(-1, 1)},
        {"infinite leaf unit", sorted, 3, fixedScale(kInf, 1)},
        {"NaN leaf unit", sorted, 3, fixedScale(kNaN, 1)},
        {"three leaves per line", sorted, 3, fixedScale(1, 3)},
        {"no leaves per line", sorted, 3, fixedScale(1, 0)},
        {"NaN leaves per line", sorted, 3, fixedScale(1, kNaN)},
    };
    for (const auto& c : cases) {
        kel_StemAndLeaf container = sentinelContainer();
        const kel_StemAndLeaf before = container;
        EXPECT_EQ(kel_RunStemAndLeaf(c.data, c.n, &c.scale, &container), KEL_STEMLEAF_INVALID_INPUT)
            << c.name;
        EXPECT_EQ(std::memcmp(&container, &before, sizeof container), 0) << c.name;
    }
    kel_StemAndLeaf container = sentinelContainer();
    EXPECT_EQ(kel_RunStemAndLeaf(sorted, 3, nullptr, &container), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(kel_RunStemAndLeaf(sorted, 3, &good, nullptr), KEL_STEMLEAF_INVALID_INPUT);
}

TEST(StemLeafBadInput, ValueBeyondTheLastOneEarlyInTheColumn) {
    // The first leaf block ends on a value far beyond the column's last value (its quotient would
    // not fit in 32 bits); the drop after it is only seen with the next block.
    std::vector<double> column(5000);
    for (std::size_t i = 0; i < column.size(); ++i) column[i] = static_cast<double>(i);
    column[2047] = 5e9;
    const kel_StemAndLeafScaleInfo scale = fixedScale(1, 10);
    kel_StemAndLeaf container = sentinelContainer();
    const kel_StemAndLeaf before = container;
    EXPECT_EQ(kel_RunStemAndLeaf(column.data(), 5000, &scale, &container),
              KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(std::memcmp(&container, &before, sizeof container), 0);
}

TEST(StemLeafBadInput, SecondRunLeavesTheFirstDisplayIntact) {
    const std::vector<double> data = {-23, -15, -8, -2, 0, 3, 7, 12, 18, 25, 31, 44};
    const kel_StemAndLeafScaleInfo scale = fixedScale(1, 10);
    kel_StemAndLeaf* container = kel_CreateStemAndLeafContainer();
    ASSERT_EQ(kel_RunStemAndLeaf(data.data(), 12, &scale, container), KEL_OK);
    const kel_StemAndLeaf fields = *container;
    const Display first = testing::copyDisplay(*container);
    const double other[] = {1, 2, 3};
    EXPECT_EQ(kel_RunStemAndLeaf(other, 3, &scale, container), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(std::memcmp(container, &fields, sizeof fields), 0);
    EXPECT_EQ(testing::copyDisplay(*container), first);
    kel_DeleteStemAndLeafContainer(&container);
}

TEST(StemLeafBadInput, ValueTooFarFromZero) {
    const double data[] = {1, 2, 3e9};
    const kel_StemAndLeafScaleInfo scale = fixedScale(1, 10);
    kel_StemAndLeaf* container = kel_CreateStemAndLeafContainer();
    EXPECT_EQ(kel_RunStemAndLeaf(data, 3, &scale, container), KEL_STEMLEAF_VALUE_TOO_LARGE);
    EXPECT_EQ(container->isComplete, 0);
    EXPECT_EQ(container->leafUnit, 1.0);
    EXPECT_EQ(container->lines, nullptr);
    EXPECT_EQ(container->lineCount, 0u);
    EXPECT_EQ(container->lowOutliers, nullptr);
    EXPECT_EQ(container->highOutliers, nullptr);
    EXPECT_EQ(container->medianLine, -1);

    // Infinite values saturate like any other value too far out; the container stays usable.
    const double infinite[] = {-kInf, 0, 1};
    EXPECT_EQ(kel_RunStemAndLeaf(infinite, 3, &scale, container), KEL_STEMLEAF_VALUE_TOO_LARGE);
    const double fine[] = {1, 2, 3};
    EXPECT_EQ(kel_RunStemAndLeaf(fine, 3, &scale, container), KEL_OK);
    kel_DeleteStemAndLeafContainer(&container);
}

TEST(StemLeafBadInput, InfiniteColumnsEndWithACode) {
    // Whatever scale infinite data produce, the run ends with a code and attaches nothing.
    const std::vector<std::vector<double>> columns = {
        {0, kInf},   {-kInf, 0}, {-kInf, kInf}, {kInf, kInf, kInf}, {-kInf, -kInf, 1, 2, 3},
        {1, 2, kInf}};
    for (const auto& column : columns) {
        for (const double increment : {0.0, 1.0, kInf}) {
            for (const std::uint8_t trim : {0, 1}) {
                kel_StemAndLeafScaleInfo scale{};
                scale.increment = increment;
                scale.trimOutliers = trim;
                const auto n = static_cast<std::uint32_t>(column.size());
                ASSERT_EQ(kel_FindStemAndLeafScaleInfo(column.data(), n, &scale), KEL_OK);
                kel_StemAndLeaf* container = kel_CreateStemAndLeafContainer();
                const std::int32_t code = kel_RunStemAndLeaf(column.data(), n, &scale, container);
                EXPECT_TRUE(code == KEL_STEMLEAF_INVALID_INPUT ||
                            code == KEL_STEMLEAF_VALUE_TOO_LARGE)
                    << code;
                EXPECT_EQ(container->lines, nullptr);
                EXPECT_EQ(container->isComplete, 0);
                kel_DeleteStemAndLeafContainer(&container);
            }
        }
    }
}

TEST(StemLeafBadInput, TooManyLinesAttachNothing) {
    // 2e7 leaf units apart at one leaf unit per line: 20 000 001 lines.
    const double data[] = {0, 2e7};
    const kel_StemAndLeafScaleInfo scale = fixedScale(1, 1, 1);
    kel_StemAndLeaf* container = kel_CreateStemAndLeafContainer();
    EXPECT_EQ(kel_RunStemAndLeaf(data, 2, &scale, container), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(container->lines, nullptr);
    EXPECT_EQ(container->lineCount, 0u);
    EXPECT_EQ(container->isComplete, 0);
    // Just under the limit is built.
    const double wide[] = {0, 9999999};
    kel_StemAndLeaf* second = kel_CreateStemAndLeafContainer();
    EXPECT_EQ(kel_RunStemAndLeaf(wide, 2, &scale, second), KEL_OK);
    EXPECT_EQ(second->lineCount, 10000000u);
    EXPECT_EQ(second->lines[9999999].leafCount, 1);
    kel_DeleteStemAndLeafContainer(&second);
    kel_DeleteStemAndLeafContainer(&container);
}

TEST(StemLeafBadInput, CreateAndDelete) {
    kel_StemAndLeaf* container = kel_CreateStemAndLeafContainer();
    ASSERT_NE(container, nullptr);
    EXPECT_EQ(container->lineCount, 0u);
    EXPECT_EQ(container->lines, nullptr);
    EXPECT_EQ(container->lowOutlierCount, 0);
    EXPECT_EQ(container->lowOutliers, nullptr);
    EXPECT_EQ(container->highOutlierCount, 0);
    EXPECT_EQ(container->highOutliers, nullptr);
    EXPECT_EQ(container->leafUnit, 0.0);
    EXPECT_EQ(container->medianLine, -1);
    EXPECT_EQ(container->isComplete, 0);
    kel_DeleteStemAndLeafContainer(&container);
    EXPECT_EQ(container, nullptr);
    kel_DeleteStemAndLeafContainer(&container);  // null container: nothing happens
    kel_DeleteStemAndLeafContainer(nullptr);     // null address: nothing happens
}

}  // namespace
}  // namespace kelstat
