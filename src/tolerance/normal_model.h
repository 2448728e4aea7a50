// The normal model: limits mean -/+ K x standard deviation, with the exact two-sided factor.
#ifndef KELSTAT_TOLERANCE_NORMAL_MODEL_H
#define KELSTAT_TOLERANCE_NORMAL_MODEL_H

#include <limits>
#include <vector>

#include "numerics/real_function.h"
#include "tolerance/tolerance_interval.h"

namespace kelstat {

class NormalModelTI : public ToleranceInterval {
  public:
    NormalModelTI(const double* observations, uint32_t count, double alphaLevel,
                  double proportionToCover, kel_ConfidenceType type);

    // From summary statistics: no observations, so estimation keeps this mean and standard
    // deviation and the limits are those of any sample with these statistics.
    NormalModelTI(uint32_t count, double mean, double standardDeviation, double alphaLevel,
                  double proportionToCover, kel_ConfidenceType type);

    // Exact two-sided factor (36-point quadrature of the coverage confidence, then a root in
    // 1/K), the same K for both limits. NaN for fewer than two observations or no root.
    void calcKFactors() override;

    // One-sided factor from the noncentral t quantile; the same for either bound.
    void calcKFactor(double& k, bool upper) const override;

    // Sample mean and standard deviation (divisor n - 1) of the observations; with none, the
    // estimates stay as they are. Always 0.
    int32_t estimateTIBasedParameters() override;
};

// The integrand h(x; t) of the two-sided equation: the probability that a chi-square with n - 1
// degrees of freedom exceeds (n - 1) r^2(x) t^2, times the standard normal density at x, where
// r^2(x) is the p-quantile of the noncentral chi-square with one degree of freedom and
// noncentrality x^2 / n.
class NormalKFactorIntegrand : public ZRXRealFunction {
  public:
    NormalKFactorIntegrand(double sampleSize, double proportion, double inverseK);
    double operator()(double x) override;

  private:
    double mSampleSize;
    double mProportion;
    double mInverseK;
};

// G(t) = 2 I(t) - 1 + alpha, where I(t) integrates h(x; t) over [0, 8.3] with the 36-point
// Gauss-Legendre rule: the confidence that mean -/+ s / t covers the proportion p, minus the
// confidence asked for. G decreases in t.
//
// r^2 and the normal density at the 36 quadrature points do not depend on t. After
// cacheNodeValues() they are computed once and every evaluation reuses them, with the same
// arithmetic in the same order as the integrand, so that the values are bit-for-bit those of
// evaluateAfresh().
class NormalKFactorIntegralFunction : public ZRXRealFunction {
  public:
    // Takes the 36-point rule once for all evaluations.
    NormalKFactorIntegralFunction(double sampleSize, double proportion, double alphaLevel);
    double operator()(double inverseK) override;

    void cacheNodeValues();

    // G(t) through a fresh NormalKFactorIntegrand and the quadrature routine, ignoring the cache.
    double evaluateAfresh(double inverseK);

  private:
    double mSampleSize;
    double mProportion;
    double mAlpha;
    std::vector<double> mNodes;
    std::vector<double> mWeights;
    // Per quadrature pair k: entries 2k and 2k + 1 belong to mid + offset and mid - offset.
    std::vector<double> mScaledSquaredRadius;
    std::vector<double> mDensity;
    // The root finder starts by evaluating the bracket ends, which the bracket search has just
    // evaluated: the last two values are kept and handed back unchanged.
    double mRecentInverseK[2] = {kNaN, kNaN};
    double mRecentValue[2] = {kNaN, kNaN};
    static constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
};

// The two-sided normal factor for sample size n (>= 2), alpha = 1 - confidence and proportion p.
// reuseNodeValues selects the cached evaluation of G; both choices give the same bits.
double normalTwoSidedKFactor(double sampleSize, double alphaLevel, double proportion,
                             bool reuseNodeValues = true);

// The one-sided normal factor, NaN for n < 2 or when the noncentral t quantile fails.
double normalOneSidedKFactor(double sampleSize, double alphaLevel, double proportion);

}  // namespace kelstat

#endif  // KELSTAT_TOLERANCE_NORMAL_MODEL_H
