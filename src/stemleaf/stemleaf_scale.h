// Scale of a stem-and-leaf display: the fuzzy leaf-unit quotient, Tukey's hinges and fences, and
// the choice of leaf unit and line width.
#ifndef KELSTAT_STEMLEAF_STEMLEAF_SCALE_H
#define KELSTAT_STEMLEAF_STEMLEAF_SCALE_H

#include <cstddef>
#include <cstdint>

struct kel_StemAndLeafScaleInfo;

namespace kelstat {

// Quotients are held to this magnitude so that every difference of two of them that the
// display needs stays close to 32 bits; a value that reaches it cannot be placed.
constexpr std::int32_t kQuotientLimit = 2147000000;

// Nudges a quotient that should be a whole number but came out a hair short (in magnitude) onto
// that whole number: 1.2 / 0.1 is 11.999999999999998 in doubles.
constexpr double kQuotientFuzz = 1.000000000001;

// Q(x): x times kQuotientFuzz, held to [-kQuotientLimit, kQuotientLimit], truncated toward zero.
// NaN gives 0. Written branch-free so that the column-wide pass over quotients vectorises.
inline std::int32_t getIntegerEqualOrNextCloserToZero(double x) {
    const double limit = kQuotientLimit;
    double scaled = x * kQuotientFuzz;
    scaled = scaled == scaled ? scaled : 0.0;
    scaled = scaled < limit ? scaled : limit;
    scaled = scaled > -limit ? scaled : -limit;
    return static_cast<std::int32_t>(scaled);
}

// The low 32 bits of value as a two's complement int32: the wrap-around of 32-bit counting,
// without the undefined behaviour of signed overflow.
std::int32_t wrapToInt32(std::int64_t value);

// 10^exponent as the correctly rounded double, for an integral exponent: 0 below the subnormal
// range, +inf above the finite range, NaN for NaN.
double exactPowerOfTen(double exponent);

struct StemAndLeafHingeInfo {
    double median;
    double lowerHinge;
    double upperHinge;
    double lowAdjacent;   // smallest value not below the lower fence
    double highAdjacent;  // largest value not above the upper fence
    std::int32_t lowAdjacentIndex;
    std::int32_t highAdjacentIndex;
};

// Tukey's hinges of the sorted column and the adjacent values inside the fences at 1.5 hinge
// spreads. Needs n >= 3 (and n below 2^31) to be meaningful. The adjacent scans stay inside the
// column even when non-finite values turn the fences into NaN.
void getHingeInfo(const double* sorted, std::uint32_t n, StemAndLeafHingeInfo& out);

// The automatic search: the smallest width multiplier x 10^k, taking the multipliers in turn
// from the first not below the raw width, whose line count over [low, high] does not exceed
// maxLines. maxLines below 2 accepts the first width tried. countZeroLine adds the extra line
// that data reaching both sides of zero (or ending at 0) need.
void findNicePositionWidth(double low, double high, const double* multipliers, int multiplierCount,
                           int maxLines, bool countZeroLine, int& lineCount, double& multiplier,
                           double& power, double& width);

// True when data[i - 1] <= data[i] for every i in [begin, end), begin >= 1: ascending, ties
// allowed, and no NaN after data[begin - 1].
bool isAscendingRun(const double* data, std::size_t begin, std::size_t end);

// True when the column ascends (ties allowed) and holds no NaN.
bool isAscendingWithoutNaN(const double* data, std::uint32_t n);

// Fills every output field of scale from the sorted, NaN-free column (n >= 1), in the automatic
// or the increment mode that scale.increment selects.
void findStemAndLeafScale(const double* sorted, std::uint32_t n, kel_StemAndLeafScaleInfo& scale);

}  // namespace kelstat

#endif  // KELSTAT_STEMLEAF_STEMLEAF_SCALE_H
