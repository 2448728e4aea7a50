// Elementary distribution functions of the stand-in: sample moments, normal, logistic,
// chi-square and gamma. The noncentral quantiles live in qdr_noncentral.cpp, the fits in
// qdr_fit.cpp.
#include "qdr.h"

#include <array>
#include <boost/math/distributions/chi_squared.hpp>
#include <boost/math/distributions/non_central_chi_squared.hpp>
#include <boost/math/special_functions/erf.hpp>
#include <boost/math/special_functions/gamma.hpp>
#include <cmath>
#include <cstddef>
#include <limits>

#include "qdr_detail.h"

namespace kelstat {
namespace qdr_detail {
namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kEpsilon = std::numeric_limits<double>::epsilon();

// Below this many values the pairwise recursion stops and four running sums take over; large
// enough to amortise the recursion, small enough that the plain sums stay accurate.
constexpr std::size_t kPairwiseBlock = 256;

// Whole and half-whole shapes up to this value take the finite-sum route for the gamma
// distribution function; beyond it the rounding of the sum's many terms would exceed a few ulps.
constexpr int kMaxFiniteSumShape = 50;

// exp(-z) stays a normal number for z below this, which the finite sum needs.
constexpr double kMaxFiniteSumArgument = 700.0;

// Other shapes: arguments within this many standard deviations of the mean (where the tails
// exceed ~1e-15 and the integrands of the tolerance factors live) take the double evaluation.
constexpr double kFastWindowDeviations = 8.0;

// The series for the lower tail converges geometrically for z < shape - 1 <= 49.5; this cap is
// far above the ~60 terms it needs and only guards the loop.
constexpr int kMaxSeriesTerms = 1000;

constexpr std::size_t kHalfStepCount = 2 * kMaxFiniteSumShape + 2;
constexpr long double kRootPi = 1.772453850905516027298167483341145183L;

// Gamma(h/2 + 1) for h = 0..2*kMaxFiniteSumShape + 1 (so shape! for whole and half-whole shapes),
// by the recurrence Gamma(z + 1) = z Gamma(z) from Gamma(1) = 1 and Gamma(3/2) = sqrt(pi)/2,
// accumulated in long double and rounded once.
constexpr std::array<double, kHalfStepCount> makeHalfStepGammas() {
    std::array<double, kHalfStepCount> table{};
    long double whole = 1.0L;
    long double half = 0.5L * kRootPi;
    for (std::size_t h = 0; h < kHalfStepCount; ++h) {
        const long double shape = 0.5L * static_cast<long double>(h);
        if (h % 2 == 0) {
            if (h > 0) {
                whole *= shape;
            }
            table[h] = static_cast<double>(whole);
        } else {
            if (h > 1) {
                half *= shape;
            }
            table[h] = static_cast<double>(half);
        }
    }
    return table;
}
constexpr std::array<double, kHalfStepCount> kHalfStepGammas = makeHalfStepGammas();

// 2 * shape when the shape is a whole or half-whole number up to kMaxFiniteSumShape, else -1.
int finiteSumHalfSteps(double shape) {
    const double twice = 2.0 * shape;
    if (!(shape <= kMaxFiniteSumShape) || std::floor(twice) != twice) {
        return -1;
    }
    return static_cast<int>(twice);
}

// Upper tail of a whole shape n: exp(-z) * sum_{k<n} z^k / k!; of a half-whole shape m + 1/2:
// erfc(sqrt z) + exp(-z) sum_{k<m} z^{k+1/2} / Gamma(k + 3/2). Both sums in nested form, so that
// the rounding of each level is damped by the next.
double finiteSumUpperTail(double z, int halfSteps) {
    double nested = 1.0;
    if (halfSteps % 2 == 0) {
        for (int k = halfSteps / 2 - 1; k >= 1; --k) {
            nested = 1.0 + nested * z / static_cast<double>(k);
        }
        return std::exp(-z) * nested;
    }
    const double root = std::sqrt(z);
    const int terms = halfSteps / 2;
    if (terms == 0) {
        return std::erfc(root);
    }
    for (int k = terms - 1; k >= 1; --k) {
        nested = 1.0 + nested * z / (static_cast<double>(k) + 0.5);
    }
    constexpr double kTwoOverRootPi = 1.128379167095512573896158903121545172;
    return std::erfc(root) + kTwoOverRootPi * root * std::exp(-z) * nested;
}

// Lower tail exp(-z) z^a / Gamma(a + 1) * sum_j z^j / ((a+1)...(a+j)) for z < a - 1: all terms
// positive and decreasing, so the small tail keeps its relative accuracy.
double seriesLowerTail(double z, int halfSteps) {
    const double shape = 0.5 * static_cast<double>(halfSteps);
    double term = 1.0;
    double sum = 1.0;
    for (int j = 1; j <= kMaxSeriesTerms; ++j) {
        term *= z / (shape + static_cast<double>(j));
        sum += term;
        if (term <= sum * (0.25 * kEpsilon)) {
            break;
        }
    }
    const double prefix =
        std::exp(-z) * std::pow(z, shape) / kHalfStepGammas[static_cast<std::size_t>(halfSteps)];
    return prefix * sum;
}

double pairwiseSumRange(const double* values, std::size_t count) {
    if (count > kPairwiseBlock) {
        const std::size_t half = count / 2;
        return pairwiseSumRange(values, half) + pairwiseSumRange(values + half, count - half);
    }
    double lanes[4] = {0.0, 0.0, 0.0, 0.0};
    std::size_t i = 0;
    for (; i + 4 <= count; i += 4) {
        lanes[0] += values[i];
        lanes[1] += values[i + 1];
        lanes[2] += values[i + 2];
        lanes[3] += values[i + 3];
    }
    for (; i < count; ++i) {
        lanes[0] += values[i];
    }
    return (lanes[0] + lanes[1]) + (lanes[2] + lanes[3]);
}

// Sums of d and d^2 for d = x - shift, pairwise like pairwiseSumRange.
void pairwiseDeviationSums(const double* values, std::size_t count, double shift, double* sum,
                           double* sumOfSquares) {
    if (count > kPairwiseBlock) {
        const std::size_t half = count / 2;
        double leftSum = 0.0;
        double leftSquares = 0.0;
        double rightSum = 0.0;
        double rightSquares = 0.0;
        pairwiseDeviationSums(values, half, shift, &leftSum, &leftSquares);
        pairwiseDeviationSums(values + half, count - half, shift, &rightSum, &rightSquares);
        *sum = leftSum + rightSum;
        *sumOfSquares = leftSquares + rightSquares;
        return;
    }
    double sums[2] = {0.0, 0.0};
    double squares[2] = {0.0, 0.0};
    std::size_t i = 0;
    for (; i + 2 <= count; i += 2) {
        const double first = values[i] - shift;
        const double second = values[i + 1] - shift;
        sums[0] += first;
        sums[1] += second;
        squares[0] += first * first;
        squares[1] += second * second;
    }
    if (i < count) {
        const double last = values[i] - shift;
        sums[0] += last;
        squares[0] += last * last;
    }
    *sum = sums[0] + sums[1];
    *sumOfSquares = squares[0] + squares[1];
}

}  // namespace

double pairwiseSum(const double* values, std::size_t count) {
    return count == 0 ? 0.0 : pairwiseSumRange(values, count);
}

double normalLower(double x) {
    return 0.5 * std::erfc(-x * M_SQRT1_2);
}

double normalUpper(double x) {
    return 0.5 * std::erfc(x * M_SQRT1_2);
}

double normalQuantile(double p) {
    if (!(p >= 0.0 && p <= 1.0)) {
        return kNaN;
    }
    if (p == 0.0) {
        return -kInfinity;
    }
    if (p == 1.0) {
        return kInfinity;
    }
    // erfc_inv keeps full relative accuracy in both tails; 2p is exact.
    return -M_SQRT2 * boost::math::erfc_inv(2.0 * p, AccuratePolicy());
}

double gammaTail(bool upperTail, double z, double shape) {
    if (z <= 0.0) {
        return upperTail ? 1.0 : 0.0;
    }
    if (std::isinf(z)) {
        return upperTail ? 0.0 : 1.0;
    }
    if (shape == 1.0) {
        return upperTail ? std::exp(-z) : -std::expm1(-z);
    }
    if (shape == 0.5) {
        return upperTail ? std::erfc(std::sqrt(z)) : std::erf(std::sqrt(z));
    }
    const int halfSteps = finiteSumHalfSteps(shape);
    if (halfSteps >= 0 && z <= kMaxFiniteSumArgument) {
        if (z >= shape - 1.0) {
            const double upper = finiteSumUpperTail(z, halfSteps);
            return upperTail ? upper : 1.0 - upper;
        }
        const double lower = seriesLowerTail(z, halfSteps);
        return upperTail ? 1.0 - lower : lower;
    }
    // Boost in double is several times faster than promoted. For the tail containing the median,
    // and within the window, its error stays near the function's own conditioning (z f(z) / tail
    // ulps for a rounding of z); for a small tail outside the window it degrades to thousands of
    // ulps, so the promoted evaluation takes over there.
    const bool largerTail = upperTail ? z < shape : z > shape;
    if (largerTail || std::fabs(z - shape) <= kFastWindowDeviations * std::sqrt(shape)) {
        return upperTail ? boost::math::gamma_q(shape, z, FastPolicy())
                         : boost::math::gamma_p(shape, z, FastPolicy());
    }
    return upperTail ? boost::math::gamma_q(shape, z, AccuratePolicy())
                     : boost::math::gamma_p(shape, z, AccuratePolicy());
}

}  // namespace qdr_detail
}  // namespace kelstat

using kelstat::qdr_detail::AccuratePolicy;

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

// The noncentral chi-square beyond one degree of freedom is a Poisson-weighted series whose
// length grows with the noncentrality: past these sizes it runs for minutes, so the answer is NaN.
constexpr double kMaxSeriesNoncentrality = 1e9;
constexpr double kMaxNoncentralQuantileDf = 1e12;

// exp(-z^2 / 2) is exactly 0 in double beyond this.
constexpr double kDensityUnderflow = 40.0;

bool isPositiveFinite(double value) {
    return std::isfinite(value) && value > 0.0;
}

}  // namespace

void qdr_GetSampleMeanAndVariance(const double* data, unsigned int count, double* mean,
                                  double* variance) {
    double sampleMean = kNaN;
    double sampleVariance = kNaN;
    if (data != nullptr && count >= 2) {
        const double n = static_cast<double>(count);
        const double firstMean = kelstat::qdr_detail::pairwiseSum(data, count) / n;
        // Second pass about the first mean; the mean of the deviations corrects the first mean's
        // rounding and removes its effect on the variance.
        double deviationSum = 0.0;
        double squareSum = 0.0;
        kelstat::qdr_detail::pairwiseDeviationSums(data, count, firstMean, &deviationSum,
                                                   &squareSum);
        sampleMean = firstMean + deviationSum / n;
        sampleVariance = (squareSum - deviationSum * (deviationSum / n)) / (n - 1.0);
        if (sampleVariance < 0.0) {
            sampleVariance = 0.0;
        }
    }
    if (mean != nullptr) {
        *mean = sampleMean;
    }
    if (variance != nullptr) {
        *variance = sampleVariance;
    }
}

double qdr_GetNormalInvCdf(double p, double mean, double sd) {
    if (!std::isfinite(mean) || !isPositiveFinite(sd)) {
        return kNaN;
    }
    return mean + sd * kelstat::qdr_detail::normalQuantile(p);
}

double qdr_GetNormalPdf(double x, double mean, double sd) {
    if (std::isnan(x) || !std::isfinite(mean) || !isPositiveFinite(sd)) {
        return kNaN;
    }
    const double z = (x - mean) / sd;
    if (!(std::fabs(z) < kDensityUnderflow)) {
        return 0.0;
    }
    // z^2 / 2 rounds with an error that exp magnifies by z^2 / 2; splitting z into a head with
    // an exact square and a small tail keeps the density within a few ulps wherever it is normal.
    constexpr double kOneOverRootTwoPi = 0.398942280401432677939946059934;
    const double head = static_cast<double>(static_cast<float>(z));
    const double tail = z - head;
    const double headHalfSquare = 0.5 * (head * head);
    const double tailPart = tail * (head + 0.5 * tail);
    return kOneOverRootTwoPi * std::exp(-headHalfSquare) * std::exp(-tailPart) / sd;
}

double qdr_GetChiSqInvCdf(double p, double df, double ncp) {
    if (!(p >= 0.0 && p <= 1.0) || !isPositiveFinite(df) || !(ncp >= 0.0) || std::isinf(ncp)) {
        return kNaN;
    }
    if (p == 0.0) {
        return 0.0;
    }
    if (p == 1.0) {
        return kInfinity;
    }
    if (ncp == 0.0) {
        return boost::math::quantile(
            boost::math::chi_squared_distribution<double, AccuratePolicy>(df), p);
    }
    if (df == 1.0) {
        return kelstat::qdr_detail::chiSquareOneDfQuantile(p, ncp);
    }
    if (ncp > kMaxSeriesNoncentrality || df > kMaxNoncentralQuantileDf) {
        return kNaN;
    }
    return boost::math::quantile(
        boost::math::non_central_chi_squared_distribution<double, AccuratePolicy>(df, ncp), p);
}

double qdr_GetChiSqCdf(int tail, double x, double df, double ncp) {
    if ((tail != QDR_LOWER_TAIL && tail != QDR_UPPER_TAIL) || std::isnan(x) ||
        !isPositiveFinite(df) || !(ncp >= 0.0) || std::isinf(ncp)) {
        return kNaN;
    }
    const bool upperTail = tail == QDR_UPPER_TAIL;
    if (ncp == 0.0) {
        return kelstat::qdr_detail::gammaTail(upperTail, 0.5 * x, 0.5 * df);
    }
    if (x <= 0.0) {
        return upperTail ? 1.0 : 0.0;
    }
    if (std::isinf(x)) {
        return upperTail ? 0.0 : 1.0;
    }
    if (df == 1.0) {
        return kelstat::qdr_detail::chiSquareOneDfTail(upperTail, x, ncp);
    }
    if (ncp > kMaxSeriesNoncentrality) {
        return kNaN;
    }
    const boost::math::non_central_chi_squared_distribution<double, AccuratePolicy> distribution(
        df, ncp);
    return upperTail ? boost::math::cdf(boost::math::complement(distribution, x))
                     : boost::math::cdf(distribution, x);
}

double qdr_GetChiSqPdf(double x, double df) {
    if (std::isnan(x) || !isPositiveFinite(df)) {
        return kNaN;
    }
    if (x < 0.0 || std::isinf(x)) {
        return 0.0;
    }
    if (x == 0.0) {
        if (df < 2.0) {
            return kInfinity;
        }
        return df == 2.0 ? 0.5 : 0.0;
    }
    // d/dx P(df/2, x/2) = gamma_p_derivative(df/2, x/2) / 2.
    return 0.5 * boost::math::gamma_p_derivative(0.5 * df, 0.5 * x, AccuratePolicy());
}

double qdr_GetGammaCdf(int tail, double x, double shape, double scale, double threshold) {
    if ((tail != QDR_LOWER_TAIL && tail != QDR_UPPER_TAIL) || std::isnan(x) ||
        !isPositiveFinite(shape) || !isPositiveFinite(scale) || !std::isfinite(threshold)) {
        return kNaN;
    }
    const double z = (x - threshold) / scale;
    return kelstat::qdr_detail::gammaTail(tail == QDR_UPPER_TAIL, z, shape);
}

double qdr_GetLogisticInvCdf(double p, double location, double scale) {
    if (!(p >= 0.0 && p <= 1.0) || !std::isfinite(location) || !isPositiveFinite(scale)) {
        return kNaN;
    }
    if (p == 0.0) {
        return -kInfinity;
    }
    if (p == 1.0) {
        return kInfinity;
    }
    // Near p = 1/2 the ratio p/(1-p) is close to 1 and log would lose its small result; log1p of
    // (2p-1)/(1-p) keeps it (2p-1 is exact there).
    double logit = 0.0;
    if (p >= 0.25 && p <= 0.75) {
        logit = std::log1p((2.0 * p - 1.0) / (1.0 - p));
    } else {
        logit = std::log(p / (1.0 - p));
    }
    return location + scale * logit;
}
