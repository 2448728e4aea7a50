// Scale selection: the fuzzy quotient, hinges and fences, powers of ten, and the worked scales of
// both modes through the exported function.
#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "kelstat.h"
#include "stemleaf/stemleaf_scale.h"

namespace kelstat {
namespace {

constexpr double kInf = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

TEST(StemLeafQuotient, FuzzLimitsAndTruncation) {
    struct Case {
        double x;
        std::int32_t expected;
    };
    const Case cases[] = {
        {0.0, 0},
        {-0.0, 0},
        {2.9, 2},
        {-2.9, -2},
        {1.2 / 0.1, 12},  // 11.999999999999998 before the fuzz
        {-1.2 / 0.1, -12},
        {0.99999999999, 0},  // too far short of 1 for the fuzz to reach it
        {2146999999.0, 2146999999},
        {2146999999.999, 2147000000},  // the fuzz lifts it onto the limit
        {3e9, 2147000000},
        {-3e9, -2147000000},
        {kInf, 2147000000},
        {-kInf, -2147000000},
        {kNaN, 0},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(getIntegerEqualOrNextCloserToZero(c.x), c.expected) << "x = " << c.x;
    }
}

TEST(StemLeafQuotient, WrapIsTwosComplement) {
    EXPECT_EQ(wrapToInt32(4294000001LL), -967295);
    EXPECT_EQ(wrapToInt32(2147483648LL), std::numeric_limits<std::int32_t>::min());
    EXPECT_EQ(wrapToInt32(-2147483649LL), std::numeric_limits<std::int32_t>::max());
    EXPECT_EQ(wrapToInt32(-5), -5);
}

TEST(StemLeafPowers, EveryDecadeIsTheCorrectlyRoundedDouble) {
    // strtod rounds correctly; the table must agree bit for bit over the whole range.
    for (int k = -330; k <= 315; ++k) {
        const std::string literal = "1e" + std::to_string(k);
        const double expected = std::strtod(literal.c_str(), nullptr);
        const double actual = exactPowerOfTen(k);
        EXPECT_EQ(std::memcmp(&expected, &actual, sizeof expected), 0) << literal;
    }
    EXPECT_EQ(exactPowerOfTen(-kInf), 0.0);
    EXPECT_EQ(exactPowerOfTen(kInf), kInf);
    EXPECT_TRUE(std::isnan(exactPowerOfTen(kNaN)));
}

TEST(StemLeafHinges, TukeyHingesAndAdjacentValues) {
    const double sample[] = {1.2, 2.5, 2.7, 3.1, 3.3, 3.8, 4.0, 4.4, 5.1, 9.9, 15.0};
    StemAndLeafHingeInfo hinges;
    getHingeInfo(sample, 11, hinges);
    EXPECT_EQ(hinges.median, 3.8);
    EXPECT_DOUBLE_EQ(hinges.lowerHinge, 2.9);
    EXPECT_DOUBLE_EQ(hinges.upperHinge, 4.75);
    EXPECT_EQ(hinges.lowAdjacentIndex, 0);
    EXPECT_EQ(hinges.highAdjacentIndex, 8);
    EXPECT_EQ(hinges.lowAdjacent, 1.2);
    EXPECT_EQ(hinges.highAdjacent, 5.1);

    // n = 9: hinges are the third values from each end; n = 8: means of the second and third.
    const double nine[] = {-40, 1, 2, 3, 4, 5, 6, 7, 8};
    getHingeInfo(nine, 9, hinges);
    EXPECT_EQ(hinges.lowerHinge, 2);
    EXPECT_EQ(hinges.upperHinge, 6);
    EXPECT_EQ(hinges.median, 4);
    EXPECT_EQ(hinges.lowAdjacentIndex, 1);  // fence 2 - 6 = -4
    EXPECT_EQ(hinges.highAdjacentIndex, 8);
    const double eight[] = {1, 2, 3, 4, 5, 6, 7, 8};
    getHingeInfo(eight, 8, hinges);
    EXPECT_EQ(hinges.lowerHinge, 2.5);
    EXPECT_EQ(hinges.upperHinge, 6.5);
    EXPECT_EQ(hinges.median, 4.5);

    // A value exactly on a fence stays inside: hinges 2 and 4, fences -1 and 7.
    const double onFence[] = {-1, 1, 2, 3, 3, 4, 4, 7};
    getHingeInfo(onFence, 8, hinges);
    EXPECT_EQ(hinges.lowerHinge, 1.5);
    const double fenced[] = {-1, 2, 2, 3, 3, 4, 4, 7};
    getHingeInfo(fenced, 8, hinges);
    EXPECT_EQ(hinges.lowerHinge, 2);
    EXPECT_EQ(hinges.upperHinge, 4);
    EXPECT_EQ(hinges.lowAdjacentIndex, 0);
    EXPECT_EQ(hinges.highAdjacentIndex, 7);
}

TEST(StemLeafHinges, InfiniteHingesStayInsideTheColumn) {
    const double allInfinite[] = {kInf, kInf, kInf, kInf};
    StemAndLeafHingeInfo hinges;
    getHingeInfo(allInfinite, 4, hinges);
    EXPECT_EQ(hinges.lowAdjacentIndex, 0);
    EXPECT_EQ(hinges.highAdjacentIndex, 3);
    const double mixed[] = {-kInf, -kInf, 0, kInf, kInf};
    getHingeInfo(mixed, 5, hinges);
    EXPECT_EQ(hinges.lowAdjacentIndex, 0);
    EXPECT_EQ(hinges.highAdjacentIndex, 4);
}

TEST(StemLeafSearch, StartsAtTheRawRatioAndWrapsToTheNextDecade) {
    const double multipliers[] = {1.0, 2.0, 5.0, 10.0};
    int lineCount = 0;
    double multiplier = 0, power = 0, width = 0;
    // 0..1000 with at most 5 lines: raw 200 starts at 2 x 100 (6 lines), then 5 x 100.
    findNicePositionWidth(0, 1000, multipliers, 4, 5, true, lineCount, multiplier, power, width);
    EXPECT_EQ(multiplier, 5.0);
    EXPECT_EQ(power, 100.0);
    EXPECT_EQ(width, 500.0);
    EXPECT_EQ(lineCount, 3);

    // raw 9.5 starts at the multiplier 10 (width 10: 20 lines); with one line fewer allowed the
    // search wraps to 1 x 10 (the same width, rejected again) and goes on to 2 x 10.
    findNicePositionWidth(0, 190, multipliers, 4, 20, false, lineCount, multiplier, power, width);
    EXPECT_EQ(lineCount, 20);
    EXPECT_EQ(width, 10.0);
    EXPECT_EQ(power, 1.0);
    findNicePositionWidth(0, 190, multipliers, 4, 19, false, lineCount, multiplier, power, width);
    EXPECT_EQ(multiplier, 2.0);
    EXPECT_EQ(power, 10.0);
    EXPECT_EQ(lineCount, 10);

    // The zero-line term counts for data ending at 0 and for both signs, not for a product that
    // underflows to -0.
    findNicePositionWidth(-1e-200, 1e-200, multipliers, 4, 18, true, lineCount, multiplier, power,
                          width);
    EXPECT_EQ(lineCount, 11);
    findNicePositionWidth(-5, 0, multipliers, 4, 1, true, lineCount, multiplier, power, width);
    EXPECT_EQ(lineCount, 3);
    findNicePositionWidth(-5, 0, multipliers, 4, 1, false, lineCount, multiplier, power, width);
    EXPECT_EQ(lineCount, 2);
}

TEST(StemLeafScale, SaturatedSpreadWrapsAndStopsTheIncrementMode) {
    // Quotients of +-3e9 saturate at +-2 147 000 000; their difference wraps to -967 296.
    const double data[] = {-3e9, 3e9};
    kel_StemAndLeafScaleInfo scale{};
    scale.increment = 1;
    ASSERT_EQ(kel_FindStemAndLeafScaleInfo(data, 2, &scale), KEL_OK);
    EXPECT_EQ(scale.leafUnit, 0.1);
    EXPECT_EQ(scale.leavesPerLine, 10);
    EXPECT_EQ(scale.lineCount, -967295);
    EXPECT_EQ(scale.increment, 1);
}

struct ScaleCase {
    const char* name;
    std::vector<double> data;
    double increment;
    bool trim;
    double leafUnit;
    double leavesPerLine;
    std::int32_t lineCount;
    double lowValue;
    double highValue;
    double incrementAfter;
};

std::vector<double> integersUpTo(int last) {
    std::vector<double> values;
    for (int i = 0; i <= last; ++i) values.push_back(i);
    return values;
}

double timesElevenTenths(double value, int rounds) {
    for (int i = 0; i < rounds; ++i) value = value * 1.1;
    return value;
}

TEST(StemLeafScale, WorkedScales) {
    const std::vector<double> twelve = {-23, -15, -8, -2, 0, 3, 7, 12, 18, 25, 31, 44};
    const std::vector<double> eleven = {1.2, 2.5, 2.7, 3.1, 3.3, 3.8, 4.0, 4.4, 5.1, 9.9, 15.0};
    const ScaleCase cases[] = {
        {"ten fives", std::vector<double>(10, 5.0), 0, false, 1, 2, 2, 5, 6.0005, 0},
        {"six zeros", std::vector<double>(6, 0.0), 0, false, 1, 1, 2, 0, 1, 0},
        {"single 0.5", {0.5}, 0, false, 1, 2, 1, 0.5, 1.50005, 0},
        {"single -7", {-7}, 0, false, 1, 2, 2, -7, -5.9993, 0},
        {"twelve", twelve, 0, false, 1, 10, 8, -23, 44, 0},
        {"ends at zero", {-5, -3, 0}, 0, false, 1, 2, 4, -5, 0, 0},
        {"all negative", {-5, -3, -1}, 0, false, 0.1, 10, 5, -5, -1, 0},
        {"0..100", integersUpTo(100), 0, false, 1, 10, 11, 0, 100, 0},
        {"0..100 by 2", integersUpTo(100), 2, false, 1, 5, 21, 0, 100, 2 * 1.1},
        {"0..100 by 10", integersUpTo(100), 10, false, 1, 10, 11, 0, 100, 10},
        {"0..100 by 1", integersUpTo(100), 1, false, 1, 5, 21, 0, 100, timesElevenTenths(1, 8)},
        {"trimmed", eleven, 0, true, 0.1, 5, 9, 1.2, 5.1, 0},
        {"untrimmed", eleven, 0, false, 1, 2, 8, 1.2, 15.0, 0},
        {"trim ignored for n = 2", {1, 100}, 0, true, 10, 5, 3, 1, 100, 0},
        {"negative increment is automatic", {1, 100}, -3, false, 10, 5, 3, 1, 100, -3},
        {"NaN increment is automatic", {1, 100}, kNaN, false, 10, 5, 3, 1, 100, kNaN},
        // 1e12 and 1e12 + 1e7 differ by 0.001 %: degenerate, one width of about one unit.
        {"near 1e12", {1e12, 1e12 + 1e7}, 0, false, 1e8, 2, 1, 1e12, 1000100000001.0, 0},
        // The increment mode's spread uses the raised high of a degenerate range.
        {"degenerate by 0.5", {5, 5, 5}, 0.5, false, 0.1, 5, 3, 5, 6.0005, 0.5},
    };
    for (const ScaleCase& c : cases) {
        SCOPED_TRACE(c.name);
        kel_StemAndLeafScaleInfo scale{};
        scale.increment = c.increment;
        scale.trimOutliers = c.trim ? 1 : 0;
        ASSERT_EQ(kel_FindStemAndLeafScaleInfo(c.data.data(),
                                               static_cast<std::uint32_t>(c.data.size()), &scale),
                  KEL_OK);
        EXPECT_EQ(scale.leafUnit, c.leafUnit);
        EXPECT_EQ(scale.leavesPerLine, c.leavesPerLine);
        EXPECT_EQ(scale.lineCount, c.lineCount);
        EXPECT_EQ(scale.lowValue, c.lowValue);
        EXPECT_EQ(scale.highValue, c.highValue);
        if (std::isnan(c.incrementAfter)) {
            EXPECT_TRUE(std::isnan(scale.increment));
        } else {
            EXPECT_EQ(scale.increment, c.incrementAfter);
        }
    }
}

TEST(StemLeafScale, RequestedNiceWidthsAreKept) {
    // A request of the form 1, 2, 5 or 10 times a power of ten is the line width itself.
    const std::vector<double> data = integersUpTo(20);
    const struct {
        double increment;
        double leafUnit;
        double leavesPerLine;
    } cases[] = {{10, 1, 10}, {5, 1, 5}, {2, 1, 2}, {1, 0.1, 10}, {0.5, 0.1, 5}, {100, 10, 10}};
    for (const auto& c : cases) {
        kel_StemAndLeafScaleInfo scale{};
        scale.increment = c.increment;
        ASSERT_EQ(kel_FindStemAndLeafScaleInfo(data.data(), 21, &scale), KEL_OK);
        EXPECT_EQ(scale.leafUnit, c.leafUnit) << c.increment;
        EXPECT_EQ(scale.leavesPerLine, c.leavesPerLine) << c.increment;
        EXPECT_EQ(scale.increment, c.increment);
    }
}

TEST(StemLeafScale, MaxLinesFollowsTheSampleSize) {
    // Evenly spread data fill the allowed lines: n = 10 allows 10, n = 50 allows 17, n >= 57 18.
    const struct {
        std::uint32_t n;
        double span;
        std::int32_t lineCount;
        double leavesPerLine;
    } cases[] = {{10, 9, 10, 10}, {10, 10.5, 6, 2}, {50, 16, 17, 10},  {50, 17.5, 9, 2},
                 {56, 17, 9, 2},  {57, 17, 18, 10}, {57, 18.5, 10, 2}, {4000, 17, 18, 10}};
    for (const auto& c : cases) {
        std::vector<double> data(c.n);
        for (std::uint32_t i = 0; i < c.n; ++i) data[i] = c.span * i / (c.n - 1);
        kel_StemAndLeafScaleInfo scale{};
        ASSERT_EQ(kel_FindStemAndLeafScaleInfo(data.data(), c.n, &scale), KEL_OK);
        EXPECT_EQ(scale.lineCount, c.lineCount) << c.n << " " << c.span;
        EXPECT_EQ(scale.leavesPerLine, c.leavesPerLine) << c.n << " " << c.span;
    }
}

TEST(StemLeafScale, InfiniteDataEndTheSearches) {
    const std::vector<std::vector<double>> columns = {{0, kInf},    {-kInf, 0},     {-kInf, kInf},
                                                      {kInf, kInf}, {-kInf, -kInf}, {1, 2, kInf}};
    for (const auto& column : columns) {
        for (const double increment : {0.0, 1.0, kInf, 5e-324}) {
            kel_StemAndLeafScaleInfo scale{};
            scale.increment = increment;
            EXPECT_EQ(kel_FindStemAndLeafScaleInfo(
                          column.data(), static_cast<std::uint32_t>(column.size()), &scale),
                      KEL_OK);
        }
    }
}

TEST(StemLeafScale, BadInputWritesNothing) {
    const double sorted[] = {1, 2, 3};
    const double unsorted[] = {1, 3, 2};
    const double withNaN[] = {1, kNaN, 3};
    const double leadingNaN[] = {kNaN};
    kel_StemAndLeafScaleInfo scale;
    std::memset(&scale, 0xAB, sizeof scale);
    scale.increment = 0;
    const kel_StemAndLeafScaleInfo before = scale;
    EXPECT_EQ(kel_FindStemAndLeafScaleInfo(nullptr, 3, &scale), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(kel_FindStemAndLeafScaleInfo(sorted, 0, &scale), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(kel_FindStemAndLeafScaleInfo(sorted, 3, nullptr), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(kel_FindStemAndLeafScaleInfo(unsorted, 3, &scale), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(kel_FindStemAndLeafScaleInfo(withNaN, 3, &scale), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(kel_FindStemAndLeafScaleInfo(leadingNaN, 1, &scale), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(std::memcmp(&scale, &before, sizeof scale), 0);

    // Out of order far from the start, past the first block checked.
    std::vector<double> late(5000);
    for (std::size_t i = 0; i < late.size(); ++i) late[i] = static_cast<double>(i);
    late[4321] = -1;
    EXPECT_EQ(kel_FindStemAndLeafScaleInfo(late.data(), 5000, &scale), KEL_STEMLEAF_INVALID_INPUT);
    late[4321] = kNaN;
    EXPECT_EQ(kel_FindStemAndLeafScaleInfo(late.data(), 5000, &scale), KEL_STEMLEAF_INVALID_INPUT);
    EXPECT_EQ(std::memcmp(&scale, &before, sizeof scale), 0);
}

}  // namespace
}  // namespace kelstat
