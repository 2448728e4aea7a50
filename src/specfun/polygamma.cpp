#include "specfun/polygamma.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>

#include "specfun/machine_constants.h"
#include "specfun/polygamma_table.h"

namespace kelstat {
namespace {

using polygamma_table::kBernoulli;

constexpr int kSuccess = 0;
constexpr int kInputError = 1;
constexpr int kOverflow = 2;
constexpr int kOrderTooLarge = 3;

// Relative accuracy aimed at: half the unit roundoff, but no finer than the 18 digits to which
// the Bernoulli numbers are given.
constexpr double kTolerance = std::max(0.5 * D1MACH(4), 0.5e-18);
// Bound on |ln| of a result, a little inside the exponent range: past it x^-(n+1) over- or
// underflows.
constexpr double kExponentLimit = 2.302 * (std::min(-I1MACH(15), I1MACH(16)) * D1MACH(5) - 3.0);
// Decimal digits carried (capped at 18.06, the constants' own precision) and their excess over 3,
// on which Amos's fitted start of the asymptotic expansion depends.
constexpr double kDecimalDigits = std::min(D1MACH(5) * I1MACH(14), 18.06);
constexpr double kDigitsOverThree = std::max(kDecimalDigits, 3.0) - 3.0;
// The expansion for order k is accurate from x >= intercept + slope * k.
constexpr double kExpansionIntercept = 3.50 + 0.40 * kDigitsOverThree;
constexpr double kExpansionSlope =
    0.21 + kDigitsOverThree * (0.0006038 * kDigitsOverThree + 0.008677);
// The downward recurrence keeps its reciprocal powers for the lower orders; past this many steps
// the orders are too high for this method and the routine reports kOrderTooLarge.
constexpr int kMaxRecurrenceSteps = 100;
// The direct series sum (x + k)^-(n+1) replaces expansion plus recurrence when the recurrence
// would be long (more than 7 steps) and the series short (fewer than 15 terms after the first).
constexpr double kMinStepsForSeries = 7.0;
constexpr double kMaxSeriesTerms = 15.0;
constexpr int kSeriesTermCapacity = 15;
// First and one-past-last index of the Bernoulli numbers B_2 ... B_40 in the table.
constexpr int kFirstExpansionIndex = 2;
constexpr int kExpansionEnd = static_cast<int>(kBernoulli.size());

using ExpansionTerms = std::array<double, kBernoulli.size()>;

enum class Status { finished, highestUnderflows };

// Number of terms after the first that the direct series needs for order n, or 0 when the
// expansion with recurrence is the better route.
int directSeriesTerms(double x, double logX, int n, double expansionStart) {
    const double exponent =
        std::min(0.0, (-2.302 * kDecimalDigits - std::min(0.0, logX)) / static_cast<double>(n));
    const double ratio = std::exp(exponent);
    // 1 - exp(exponent), taken from the exponent itself when the subtraction would cancel.
    const double complement = std::fabs(exponent) < 1.0e-3 ? -exponent : 1.0 - ratio;
    const double termsNeeded = x * complement / ratio;
    if (expansionStart - x > kMinStepsForSeries && termsNeeded < kMaxSeriesTerms) {
        return static_cast<int>(termsNeeded) + 1;
    }
    return 0;
}

// Orders n .. n+count-1 (n >= 1) by summing (x + k)^-(order+1) over k directly; the terms of
// each order come from those of the previous one by one division.
void sumDirectSeries(double x, int n, int count, int termCount, double* ans) {
    const double power = static_cast<double>(n) + 1.0;
    std::array<double, kSeriesTermCapacity> terms{};
    // x^-(n+1) by pow rather than exp(-(n+1) ln x), whose error grows with the exponent.
    double leading = std::pow(x, -power);
    double sum = leading;
    double denominator = x;
    for (int k = 0; k < termCount; ++k) {
        denominator += 1.0;
        terms[k] = std::pow(denominator, -power);
        sum += terms[k];
    }
    ans[0] = sum;

    const double relativeCutoff = kTolerance / 5.0;
    for (int member = 1; member < count; ++member) {
        leading /= x;
        sum = leading;
        const double cutoff = leading * relativeCutoff;
        denominator = x;
        for (int k = 0; k < termCount; ++k) {
            denominator += 1.0;
            terms[k] /= denominator;
            sum += terms[k];
            if (terms[k] < cutoff) break;
        }
        ans[member] = sum;
    }
}

// Arguments below the working accuracy: x^-(n+1) is the whole answer to double precision.
void fillTinyArgument(double x, double logX, int n, int kode, int count, double* ans) {
    ans[0] = std::pow(x, -(static_cast<double>(n) + 1.0));
    for (int member = 1; member < count; ++member) ans[member] = ans[member - 1] / x;
    if (n == 0 && kode == 2) ans[0] += logX;
}

// 1/order + 1/(2x): the terms of the expansion in front of the Bernoulli sum (1/(2x) alone for
// the digamma function, whose logarithm is handled separately).
double leadingTerms(double order, double halfReciprocal) {
    return order != 0.0 ? halfReciprocal + 1.0 / order : halfReciprocal;
}

// Bernoulli sum of the expansion for the highest order; stores its terms for the lower orders.
double expansionSumHighest(double order, double reciprocalSquare, double tolerance,
                           ExpansionTerms& terms) {
    double factor = (order + 1.0) * (0.5 * reciprocalSquare);
    double sum = factor * kBernoulli[kFirstExpansionIndex];
    if (std::fabs(sum) < tolerance) return sum;
    double twiceIndex = 2.0;
    for (int k = kFirstExpansionIndex + 1; k < kExpansionEnd; ++k) {
        factor = factor * ((twiceIndex + order + 1.0) / (twiceIndex + 1.0)) *
                 ((twiceIndex + order) / (twiceIndex + 2.0)) * reciprocalSquare;
        terms[k] = factor * kBernoulli[k];
        if (std::fabs(terms[k]) < tolerance) break;
        sum += terms[k];
        twiceIndex += 2.0;
    }
    return sum;
}

// Bernoulli sum for the next lower order, rescaling the stored terms in place. Each term shrinks
// relative to its predecessor, so no term beyond where the higher order stopped is ever read.
double expansionSumLower(double order, double reciprocalSquare, double tolerance,
                         ExpansionTerms& terms) {
    const double first = (order + 1.0) * (0.5 * reciprocalSquare);
    double sum = first * kBernoulli[kFirstExpansionIndex];
    if (std::fabs(sum) < tolerance) return sum;
    double divisor = 4.0 + order;
    for (int k = kFirstExpansionIndex + 1; k < kExpansionEnd; ++k) {
        terms[k] = terms[k] * (order + 1.0) / divisor;
        if (std::fabs(terms[k]) < tolerance) break;
        sum += terms[k];
        divisor += 2.0;
    }
    return sum;
}

// A sum whose rounding errors are carried separately (Knuth's two-sum), for the digamma function
// near its root, where the result is far smaller than the terms.
class CompensatedSum {
  public:
    explicit CompensatedSum(double start) : value_(start) {}
    void add(double term) {
        const double total = value_ + term;
        const double termPart = total - value_;
        error_ += (value_ - (total - termPart)) + (term - termPart);
        value_ = total;
    }
    // Adds a correction known to be far below the rounding unit of the sum.
    void addCorrection(double correction) { error_ += correction; }
    // An infinite sum leaves a NaN error term behind; the sum itself is the answer then.
    double result() const { return std::isfinite(value_) ? value_ + error_ : value_; }

  private:
    double value_;
    double error_ = 0.0;
};

// The rounding error of sum = fl(a + b): a + b = sum + error exactly.
double additionError(double a, double b, double sum) {
    const double bPart = sum - a;
    return (a - (sum - bPart)) + (b - bPart);
}

// ln 2 split so that (binary exponent) * kLn2High is exact.
constexpr double kLn2High = 6.93147180369123816490e-01;
constexpr double kLn2Low = 1.90821492927058770002e-10;

// ln(y) for y >= 1 as high + low with about 1e-17 absolute error: y = 2^e m, 1 <= m < 2, gives
// ln y = e ln 2 + log1p(m - 1), where m - 1 and e * kLn2High are exact.
void splitLog(double y, double* high, double* low) {
    if (!std::isfinite(y)) {
        *high = std::log(y);
        *low = 0.0;
        return;
    }
    int exponent = 0;
    const double mantissa = 2.0 * std::frexp(y, &exponent);
    const double binaryExponent = static_cast<double>(exponent - 1);
    const double exponentPart = binaryExponent * kLn2High;
    const double mantissaPart = std::log1p(mantissa - 1.0);
    *high = exponentPart + mantissaPart;
    *low = additionError(exponentPart, mantissaPart, *high) + binaryExponent * kLn2Low;
}

// Completes -psi(x) from the expansion's value `sum` at shifted = x + shift (rounded): adds
// 1/(x + k) for the recurrence steps, smallest first, and takes off the logarithm (kode 1) or its
// shift (kode 2). Near the root of psi the result is some 20 times smaller than the sum and the
// logarithm, so for kode 1 the additions, the reciprocals, the logarithm and the rounding of
// x + shift are all carried to about 1e-17; the method is unchanged.
void finishDigamma(double sum, double x, int steps, double shift, double shifted, int kode,
                   double* ans) {
    CompensatedSum total(sum);
    for (int k = steps - 1; k >= 0; --k) {
        // x + k first, in one rounding, keeps 1/x accurate for tiny x.
        const double offset = static_cast<double>(k);
        const double denominator = x + offset;
        const double denominatorLow = additionError(x, offset, denominator);
        const double reciprocal = 1.0 / denominator;
        total.add(reciprocal);
        total.addCorrection(
            (std::fma(-reciprocal, denominator, 1.0) - reciprocal * denominatorLow) / denominator);
    }
    if (kode == 2) {
        if (shifted != x) total.add(-std::log(shifted / x));
        ans[0] = total.result();
        return;
    }
    double logHigh = 0.0;
    double logLow = 0.0;
    splitLog(shifted, &logHigh, &logLow);
    total.add(-logHigh);
    // The expansion ran at the rounded x + shift; -psi'(shifted) * (rounding error), with
    // psi'(y) ~ 1/y + 1/(2 y^2), moves it to the exact point.
    const double shiftedLow = additionError(x, shift, shifted);
    const double trigamma = (1.0 + 0.5 / shifted) / shifted;
    total.addCorrection(-logLow - trigamma * shiftedLow);
    ans[0] = total.result();
}

// Orders n .. n+count-1 by the asymptotic expansion at x shifted up to the expansion's start,
// then the recurrence W(x) = W(x + 1) + x^-(order+1) back down to x.
Status expandAndRecur(double x, double logX, int n, int kode, int count, double expansionStart,
                      double* ans, int* nz, int* ierr) {
    double shift = 0.0;
    double shifted = x;
    double logShifted = logX;
    if (x < expansionStart) {
        shift = expansionStart - std::trunc(x);
        shifted = x + shift;
        logShifted = std::log(shifted);
    }

    double order = static_cast<double>(n) + static_cast<double>(count - 1);
    const double logScale = order * logShifted;
    // Amos also counts 1/x^2, the step of the expansion, which makes the published routine
    // report -psi itself as underflowed for x above about 1e152; for order 0 an underflowing
    // 1/x^2 only drops terms that are negligible anyway, so the digamma member is exempt.
    const double largestExponent = std::max(
        {std::fabs(logScale), std::fabs(2.0 * logShifted), std::fabs(logScale + logShifted)});
    if (largestExponent > kExponentLimit && order != 0.0) return Status::highestUnderflows;

    double scale = std::pow(shifted, -order);  // not exp(-logScale): no error growth with order
    const double halfReciprocal = 0.5 / shifted;
    const double tolerance = kTolerance * halfReciprocal;
    const double reciprocalSquare = 1.0 / (shifted * shifted);
    ExpansionTerms terms{};
    double sum = (expansionSumHighest(order, reciprocalSquare, tolerance, terms) +
                  leadingTerms(order, halfReciprocal)) *
                 scale;

    if (shift > kMaxRecurrenceSteps) {
        *nz = 0;
        *ierr = kOrderTooLarge;
        return Status::finished;
    }
    const int steps = static_cast<int>(shift);
    if (order == 0.0) {
        finishDigamma(sum, x, steps, shift, shifted, kode, ans);
        return Status::finished;
    }

    // x + (shift - 1 - k) rather than a running decrement keeps the smallest base exact.
    std::array<double, kMaxRecurrenceSteps> reciprocalPowers{};
    for (int k = 0; k < steps; ++k) {
        const double base = x + (shift - 1.0 - static_cast<double>(k));
        reciprocalPowers[k] = std::pow(base, -(order + 1.0));
        sum += reciprocalPowers[k];
    }
    ans[count - 1] = sum;

    for (int member = count - 2; member >= 0; --member) {
        order -= 1.0;
        scale *= shifted;
        sum = (expansionSumLower(order, reciprocalSquare, tolerance, terms) +
               leadingTerms(order, halfReciprocal)) *
              scale;
        if (order == 0.0) {
            finishDigamma(sum, x, steps, shift, shifted, kode, ans);
            return Status::finished;
        }
        for (int k = 0; k < steps; ++k) {
            reciprocalPowers[k] *= x + (shift - 1.0 - static_cast<double>(k));
            sum += reciprocalPowers[k];
        }
        ans[member] = sum;
    }
    return Status::finished;
}

}  // namespace

void XDPSIFN(double x, int n, int kode, int m, double* ans, int* nz, int* ierr) {
    *ierr = kSuccess;
    *nz = 0;
    if (std::isnan(x) && m >= 1) {
        std::fill(ans, ans + m, std::numeric_limits<double>::quiet_NaN());
    }
    if (!(x > 0.0) || n < 0 || kode < 1 || kode > 2 || m < 1) {
        *ierr = kInputError;
        return;
    }

    const double logX = std::log(x);
    // Members whose order makes the result underflow are zeroed from the top down, until the
    // highest remaining one is representable. The digamma member alone (order 0, about -ln x)
    // never underflows, so it is exempt.
    for (int count = m; count > 0; --count) {
        const double highestOrder = static_cast<double>(n) + static_cast<double>(count - 1);
        const double logMagnitude = (highestOrder + 1.0) * logX;
        const bool digammaOnly = highestOrder == 0.0;
        if (std::fabs(logMagnitude) > kExponentLimit && !(digammaOnly && logMagnitude > 0.0)) {
            if (logMagnitude <= 0.0) {
                *nz = 0;
                *ierr = kOverflow;
                return;
            }
        } else if (x < kTolerance) {
            fillTinyArgument(x, logX, n, kode, count, ans);
            return;
        } else {
            const double expansionStart =
                std::floor(kExpansionIntercept + kExpansionSlope * highestOrder) + 1.0;
            const int seriesTerms = n != 0 ? directSeriesTerms(x, logX, n, expansionStart) : 0;
            if (seriesTerms > 0) {
                sumDirectSeries(x, n, count, seriesTerms, ans);
                return;
            }
            if (expandAndRecur(x, logX, n, kode, count, expansionStart, ans, nz, ierr) ==
                Status::finished) {
                return;
            }
        }
        ans[count - 1] = 0.0;
        ++*nz;
    }
}

double psi(double x) {
    double ans = 0.0;
    int underflowCount = 0;
    int errorFlag = 0;
    XDPSIFN(x, 0, 1, 1, &ans, &underflowCount, &errorFlag);
    return -ans;
}

}  // namespace kelstat
