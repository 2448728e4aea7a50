#include "stemleaf/stemleaf_scale.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "kelstat.h"
#include "stemleaf/stemleaf_power_table.h"

namespace kelstat {

namespace {

// Line widths of the automatic search, in leaf units, ascending.
constexpr double kNiceMultipliers[] = {1.0, 2.0, 5.0, 10.0};
constexpr int kNiceMultiplierCount = sizeof(kNiceMultipliers) / sizeof(kNiceMultipliers[0]);

// Bounds on the number of lines the automatic mode aims for, whatever the sample size.
constexpr int kFewestLines = 3;
constexpr int kMostLines = 18;

// Relative and absolute closeness under which the extremes count as one value.
constexpr double kDegenerateRelative = 0.0001;
constexpr double kDegenerateAbsolute = 1e-9;

// The increment mode shrinks the request a little before rounding it up to a nice width, so that
// a request that is itself nice stays that width, and widens it when too many lines result.
constexpr double kIncrementShrink = 0.99999;
constexpr double kIncrementGrowth = 1.1;
constexpr std::int32_t kMostIncrementSpread = 48;

// The search moves up one decade per four steps; from the smallest subnormal power to overflow
// (after which every quotient is 0 and the search stops) is about 2 600 steps.
constexpr int kMaxSearchSteps = 4000;

// Each rejected round grows the working width by at least 9.99 %, so it overflows (and the
// spread drops to 0) within about 7 900 rounds from the smallest subnormal request.
constexpr int kMaxIncrementRounds = 10000;

// Columns are checked for order in blocks, leaving early after the first block that fails.
constexpr std::size_t kOrderCheckBlock = 4096;

int maxLinesForSampleSize(std::uint32_t n) {
    const double lines = std::round(10.0 * std::log10(static_cast<double>(n)));
    return static_cast<int>(std::clamp(lines, double{kFewestLines}, double{kMostLines}));
}

}  // namespace

std::int32_t wrapToInt32(std::int64_t value) {
    const auto bits = static_cast<std::uint32_t>(value);
    std::int32_t wrapped;
    std::memcpy(&wrapped, &bits, sizeof wrapped);
    return wrapped;
}

double exactPowerOfTen(double exponent) {
    if (std::isnan(exponent)) return exponent;
    if (exponent < kSmallestTabledDecade) return 0.0;
    if (exponent > kLargestTabledDecade) return HUGE_VAL;
    return kPowersOfTen[static_cast<int>(exponent) - kSmallestTabledDecade];
}

void getHingeInfo(const double* sorted, std::uint32_t n, StemAndLeafHingeInfo& out) {
    // 64-bit index arithmetic: n + 1 must not wrap for the largest counts.
    const std::uint64_t count = n;
    const std::uint64_t half = count / 2;
    out.median = (sorted[half] + sorted[count - 1 - half]) / 2;

    const std::uint64_t depthOfMedian = (count + 1) / 2;
    const std::uint64_t depthOfHinge = (count + 1) / 4;
    out.lowerHinge = (sorted[depthOfHinge] + sorted[depthOfMedian - 1 - depthOfHinge]) / 2;
    out.upperHinge =
        (sorted[count - depthOfMedian + depthOfHinge] + sorted[count - 1 - depthOfHinge]) / 2;

    const double step = 1.5 * (out.upperHinge - out.lowerHinge);
    const double lowerFence = out.lowerHinge - step;
    const double upperFence = out.upperHinge + step;

    // A value equal to a fence stays inside. A NaN fence (hinges at the same infinity) sets
    // nothing aside; both scans stop at the column's ends whatever the fences are.
    std::uint64_t low = 0;
    if (lowerFence > sorted[0]) {
        low = 1;
        while (low + 1 < count && sorted[low] < lowerFence) ++low;
    }
    std::uint64_t high = count - 1;
    if (upperFence < sorted[high]) {
        while (high > 0 && !(sorted[high] <= upperFence)) --high;
    }
    out.lowAdjacentIndex = static_cast<std::int32_t>(low);
    out.highAdjacentIndex = static_cast<std::int32_t>(high);
    out.lowAdjacent = sorted[low];
    out.highAdjacent = sorted[high];
}

void findNicePositionWidth(double low, double high, const double* multipliers, int multiplierCount,
                           int maxLines, bool countZeroLine, int& lineCount, double& multiplier,
                           double& power, double& width) {
    const double raw = (high - low) / maxLines;
    double decade = std::floor(std::log10(raw));
    power = exactPowerOfTen(decade);
    const double ratio = raw / power;

    int index = multiplierCount - 1;
    for (int i = 0; i < multiplierCount; ++i) {
        if (multipliers[i] >= ratio) {
            index = i;
            break;
        }
    }
    const int zeroLine = countZeroLine && (high == 0.0 || low * high < 0.0) ? 1 : 0;

    for (int step = 0;; ++step) {
        multiplier = multipliers[index];
        width = multiplier * power;
        const std::int64_t lines = std::int64_t{getIntegerEqualOrNextCloserToZero(high / width)} -
                                   getIntegerEqualOrNextCloserToZero(low / width) + 1 + zeroLine;
        lineCount = wrapToInt32(lines);
        if (maxLines < 2 || lineCount <= maxLines || step >= kMaxSearchSteps) return;
        if (index == multiplierCount - 1) {
            // Next decade from the table rather than power * 10, which can drift by an ulp.
            decade += 1;
            power = exactPowerOfTen(decade);
            index = 0;
        } else {
            ++index;
        }
    }
}

bool isAscendingRun(const double* data, std::size_t begin, std::size_t end) {
    std::size_t i = begin;
#if defined(__SSE2__)
    // Four neighbour pairs per step in packed compares (an unordered compare fails, so NaN fails
    // too); compilers leave the scalar form unvectorised since a compare may raise a flag.
    __m128d ascending = _mm_castsi128_pd(_mm_set1_epi32(-1));
    for (; i + 4 <= end; i += 4) {
        const __m128d low =
            _mm_and_pd(_mm_cmple_pd(_mm_loadu_pd(data + i - 1), _mm_loadu_pd(data + i)),
                       _mm_cmple_pd(_mm_loadu_pd(data + i + 1), _mm_loadu_pd(data + i + 2)));
        ascending = _mm_and_pd(ascending, low);
    }
    if (_mm_movemask_pd(ascending) != 3) return false;
#endif
    for (; i < end; ++i) {
        if (!(data[i - 1] <= data[i])) return false;
    }
    return true;
}

bool isAscendingWithoutNaN(const double* data, std::uint32_t n) {
    if (n == 0) return true;
    if (std::isnan(data[0])) return false;
    // Every NaN after the first value fails the comparison with its predecessor. Blocks let a
    // column that fails early stop early.
    for (std::size_t start = 1; start < n; start += kOrderCheckBlock) {
        const std::size_t end = std::min<std::size_t>(n, start + kOrderCheckBlock);
        if (!isAscendingRun(data, start, end)) return false;
    }
    return true;
}

void findStemAndLeafScale(const double* sorted, std::uint32_t n, kel_StemAndLeafScaleInfo& scale) {
    double low = sorted[0];
    double high = sorted[n - 1];
    if (n >= 3 && scale.trimOutliers != 0) {
        StemAndLeafHingeInfo hinges;
        getHingeInfo(sorted, n, hinges);
        low = hinges.lowAdjacent;
        high = hinges.highAdjacent;
    }

    int maxLines = maxLinesForSampleSize(n);
    const double nearLow = low + std::fabs(low) * kDegenerateRelative + kDegenerateAbsolute;
    if (nearLow > high) {
        // One value, or extremes too close to tell apart: a single width of about one unit.
        maxLines = 1;
        high = 1.0 + low + std::fabs(low) * kDegenerateRelative;
    }

    double increment = scale.increment;
    int lineCount = 0;
    double multiplier = 0.0;
    double power = 0.0;
    if (increment > 0.0) {
        double working = increment;
        for (int round = 0;; ++round) {
            working = working * kIncrementShrink;
            power = exactPowerOfTen(std::floor(std::log10(working)));
            const double ratio = working / power;
            multiplier = ratio <= 1.0 ? 1.0 : ratio <= 2.0 ? 2.0 : ratio <= 5.0 ? 5.0 : 10.0;
            const double width = power * multiplier;
            const std::int32_t spread =
                wrapToInt32(std::int64_t{getIntegerEqualOrNextCloserToZero(high / width)} -
                            getIntegerEqualOrNextCloserToZero(low / width));
            if (spread <= kMostIncrementSpread || round >= kMaxIncrementRounds) {
                lineCount = wrapToInt32(std::int64_t{spread} + 1);
                break;
            }
            increment = increment * kIncrementGrowth;
            working = working * kIncrementGrowth;
        }
    } else {
        double width = 0.0;
        findNicePositionWidth(low, high, kNiceMultipliers, kNiceMultiplierCount, maxLines, true,
                              lineCount, multiplier, power, width);
    }

    scale.leafUnit = power;
    scale.leavesPerLine = multiplier;
    scale.lineCount = lineCount;
    scale.lowValue = low;
    scale.highValue = high;
    scale.increment = increment;
}

}  // namespace kelstat
