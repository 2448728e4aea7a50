#include "numerics/golden_section.h"

#include <cmath>
#include <limits>

#include "numerics/real_function.h"

namespace kelstat {

namespace {

// The two section ratios, (sqrt(5) - 1) / 2 and its complement, each correctly rounded. The
// complement is stored rather than formed as 1 - r, which would land two ulps low.
constexpr double kLongSection = 0.6180339887498949;
constexpr double kShortSection = 0.3819660112501052;

// Each step shrinks the interval by the long section, so even the widest finite interval falls
// below the smallest subnormal spacing within about 3000 steps; any run still going by then can
// no longer converge (a minimum at 0 does this) and ends with the current midpoint.
constexpr int kMaxSteps = 10000;

// The integer walk settles within a step or two of a unimodal minimum; past this many it has run
// away from the interval (or the integers no longer step) and stops where it is.
constexpr int kMaxIntegerSteps = 1 << 20;

double integerMinimum(double start, ZRXRealFunction& f) {
    double n = std::floor(start);
    for (int step = 0; step < kMaxIntegerSteps; ++step) {
        // Both values are evaluated afresh for each candidate; f may keep state between calls.
        const double here = f(n);
        const double next = f(n + 1.0);
        if (!(here > next)) return n;
        n += 1.0;
    }
    return n;
}

}  // namespace

double calcGoldenSection(double a, double b, ZRXRealFunction& f, bool integerX) {
    const double width = b - a;
    double upperPoint = a + kLongSection * width;
    double lowerPoint = a + kShortSection * width;
    double lowerValue = f(lowerPoint);
    double upperValue = f(upperPoint);
    if (std::isnan(lowerValue) || std::isnan(upperValue))
        return std::numeric_limits<double>::quiet_NaN();

    bool converged = f.mIsConvergedForX(upperPoint, lowerPoint);
    for (int step = 0; !converged && step < kMaxSteps; ++step) {
        // The interior point that stays becomes the other interior point of the smaller interval;
        // it is reused as it stands, never recomputed from the new ends.
        if (upperValue > lowerValue) {
            b = upperPoint;
            upperPoint = lowerPoint;
            upperValue = lowerValue;
            const double previous = lowerPoint;
            lowerPoint = a + kShortSection * (b - a);
            lowerValue = f(lowerPoint);
            converged = f.mIsConvergedForX(previous, lowerPoint);
        } else {
            a = lowerPoint;
            lowerPoint = upperPoint;
            lowerValue = upperValue;
            const double previous = upperPoint;
            upperPoint = a + kLongSection * (b - a);
            upperValue = f(upperPoint);
            converged = f.mIsConvergedForX(upperPoint, previous);
        }
    }

    if (integerX) return integerMinimum(lowerPoint, f);
    return (upperPoint + lowerPoint) * 0.5;
}

}  // namespace kelstat
