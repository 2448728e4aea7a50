// Internal pieces shared by the qdr_ translation units: the non-throwing Boost policies and the
// helpers that have their own accuracy contracts. Nothing here is visible outside the stand-in.
#ifndef KELSTAT_PLATFORM_QDR_DETAIL_H
#define KELSTAT_PLATFORM_QDR_DETAIL_H

#include <boost/math/policies/policy.hpp>
#include <cstddef>
#include <limits>

namespace kelstat {
namespace qdr_detail {

// Every Boost error becomes a quiet NaN (or the saturated value for overflow), never an exception.
// Internal arithmetic stays promoted to long double: in double, Boost's incomplete gamma function
// loses up to thousands of ulps in the far tails at large shapes.
using AccuratePolicy = boost::math::policies::policy<
    boost::math::policies::domain_error<boost::math::policies::ignore_error>,
    boost::math::policies::pole_error<boost::math::policies::ignore_error>,
    boost::math::policies::overflow_error<boost::math::policies::ignore_error>,
    boost::math::policies::underflow_error<boost::math::policies::ignore_error>,
    boost::math::policies::denorm_error<boost::math::policies::ignore_error>,
    boost::math::policies::evaluation_error<boost::math::policies::ignore_error>,
    boost::math::policies::rounding_error<boost::math::policies::ignore_error>,
    boost::math::policies::indeterminate_result_error<boost::math::policies::ignore_error>>;

// The same evaluated in double: several times faster for the incomplete gamma function, used only
// where its error stays close to the function's conditioning.
using FastPolicy =
    boost::math::policies::normalise<AccuratePolicy,
                                     boost::math::policies::promote_double<false>>::type;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kEpsilon = std::numeric_limits<double>::epsilon();

// Sum of values[0..count) by pairwise blocks: error grows with log(count), not count.
double pairwiseSum(const double* values, std::size_t count);

// Standard normal lower tail Phi(x) and upper tail 1 - Phi(x), each with full relative accuracy.
double normalLower(double x);
double normalUpper(double x);

// Standard normal quantile, accurate to a few ulps; p outside [0, 1] gives NaN.
double normalQuantile(double p);

// The same in double arithmetic: a few ulps off at worst, several times faster; for starting
// points and brackets, which are widened or iterated past its error.
double roughNormalQuantile(double p);

// Quantile of the noncentral chi-square with one degree of freedom and noncentrality
// lambda >= 0, through P(X <= r^2) = Phi(r - sqrt(lambda)) - Phi(-r - sqrt(lambda)).
double chiSquareOneDfQuantile(double p, double lambda);

// P(X <= x) (or P(X > x) when upperTail) for that distribution, x >= 0.
double chiSquareOneDfTail(bool upperTail, double x, double lambda);

// Noncentral t quantile for finite df > 0 and finite ncp != 0 (NaN when it cannot be computed).
double noncentralTQuantile(double p, double df, double ncp);

// Shapes from which gammaQuantile is used; below, the Wilson-Hilferty start is too rough.
constexpr double kHalleyMinShape = 2.0;

// Gamma(shape, 1) quantile for shape >= kHalleyMinShape and 0 < p < 1, or NaN if the iteration
// does not settle.
double gammaQuantile(double p, double shape);

// Far from the shape the smaller gamma tail is below exp(-a (r - 1 - ln r)), r = z/a (Chernoff's
// bound); once that is under 2^-57 (exp(-40)) the larger tail rounds to exactly 1, whatever the
// route. This applies where the larger tail is asked for and r >= 2 or r <= 1/2.
constexpr double kSaturationExponent = 40.0;

inline bool farFromShape(bool upperTail, double z, double shape) {
    return upperTail == (z < shape) && (z >= 2.0 * shape || z <= 0.5 * shape);
}

// ln r <= (r - 1/r) / 2 for r >= 1 and -ln r >= 2 (1 - r) / (1 + r) for r < 1 bound the exponent
// from below by (z - a)^2 / (2 z) and (z - a)^2 / (z + a): this settles most saturated calls
// without a division or a logarithm.
inline bool saturatedByQuickBound(double z, double shape) {
    const double difference = z - shape;
    return difference * difference >
           (difference > 0.0 ? 2.0 * kSaturationExponent * z : kSaturationExponent * (z + shape));
}

// gammaTail for the calls the quick bound does not settle.
double gammaTailBeyondQuickBound(bool upperTail, double z, double shape);

// Gamma distribution function of the unit-scale variable z >= 0: lower tail P(G <= z) when
// upperTail is false, else P(G > z). The quick saturation test inlines into the callers: in the
// extreme-value K-factor integrands a third of the calls end there.
inline double gammaTail(bool upperTail, double z, double shape) {
    if (farFromShape(upperTail, z, shape) && saturatedByQuickBound(z, shape)) {
        return 1.0;
    }
    return gammaTailBeyondQuickBound(upperTail, z, shape);
}

}  // namespace qdr_detail
}  // namespace kelstat

#endif  // KELSTAT_PLATFORM_QDR_DETAIL_H
