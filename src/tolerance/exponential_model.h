// Exponential model: every limit is a multiple of the sample mean. One-sided factors are closed
// forms in chi-square quantiles; the two-sided factors come from a three-parameter Newton-Raphson
// solve of the equations that make the interval's coverage exact.
#ifndef KELSTAT_TOLERANCE_EXPONENTIAL_MODEL_H
#define KELSTAT_TOLERANCE_EXPONENTIAL_MODEL_H

#include <vector>

#include "numerics/newton_raphson.h"
#include "tolerance/tolerance_interval.h"

namespace kelstat {

// The objective behind the two-sided exponential factors, in the parameters (x1, x2, v).
// With r the ratio of sample mean to population mean, 2n r is chi-square with m = 2n degrees of
// freedom, and the interval from -ln(v) to -ln(1 - v) times the sample mean covers the fraction
// v^r - (1 - v)^r of the population. Three equations fix (x1, x2, v):
//   h(x1, x2) = C(m x2) - C(m x1) - (1 - alpha) = 0   (C the chi-square distribution function)
//   g(x1, v) = 0 and g(x2, v) = 0,  g(x, v) = v^x - (1 - v)^x - p,
// and the objective -(h^2 + g1^2 + g2^2) has its maximum, 0, at their solution.
//
// v > 1, v within the fuzz of 1 and x < 0 are outside g's domain: g is 0 there and the validity
// flag is cleared. Each g evaluation resets the flag first, so calculateFunction reports only the
// test on (x2, v).
class ExponentialTSKFactorHelper : public FunctionFirstNegSecondDerivative {
  public:
    ExponentialTSKFactorHelper(double sampleSize, double alphaLevel, double proportion);
    virtual ~ExponentialTSKFactorHelper() = default;

    // Sets *parameterIndex to -1 on every call: no parameter has a fixed point.
    double calculateFunction(const std::vector<double>& theta, bool* valid, int* parameterIndex,
                             int) const override;
    // All zeros when (x2, v) is outside g's domain.
    void calculateFirstDerivative(const std::vector<double>& theta, std::vector<double>& gradient,
                                  bool* valid) const override;
    // Formed whatever the validity flag says; the gradient argument is not read.
    void calculateNegSecondDerivative(const std::vector<double>& theta,
                                      const std::vector<double>& gradient,
                                      SymmetricMatrix& negHessian, bool* valid) const override;
    // For n > 1: v where the lower limit is the one-sided lower limit at (1 - alpha/2, (1 + p)/2),
    // x2 where v^x2 = p, and x1 where h(x1, x2) = 0. For n <= 1 a cruder start.
    void calculateStartingEstimates(std::vector<double>& theta) const override;

    double mH(double x1, double x2) const;
    double mG(double x, double v, bool* valid) const;
    // dh/dx1, dh/dx2.
    void mHDerivatives(double x1, double x2, std::vector<double>& d) const;
    // dg/dx, dg/dv.
    void mGDerivatives(double x, double v, std::vector<double>& d) const;
    // d2h/dx1^2, d2h/dx2^2 (the mixed derivative is 0).
    void mHSecDerivatives(double x1, double x2, std::vector<double>& d) const;
    // d2g/dx^2, d2g/dv^2, d2g/dx dv.
    void mGSecDerivatives(double x, double v, std::vector<double>& d) const;

    // Whether theta = (x1, x2, v) solves the three equations inside g's domain: 0 < v, v below 1
    // and not within the fuzz of it, x1 and x2 finite and not negative, and |h|, |g1|, |g2| each
    // within kSolutionTolerance. A maximisation that stopped short of the maximum fails this.
    bool solvesEquations(const std::vector<double>& theta) const;

    static constexpr double kSolutionTolerance = 1e-8;

    // For a maximisation that stopped where the objective is flat to its tolerances but the
    // equations are not yet met. Newton steps on the three equations themselves, in
    // (x1, x2, ln(1 - v)) so that v near 1 keeps its digits, halved while they do not reduce the
    // largest residual; then, for each double next to the solution's v, the ratio bounds refitted
    // by fitRatioBounds, keeping the triple with the smallest residuals. True when that triple
    // passes solvesEquations; theta holds it either way (unchanged when v is not in (0, 1)).
    bool refineSolution(std::vector<double>& theta) const;

    // With v held: x2 from g2 = 0, then x1 by least squares on h and g1.
    void fitRatioBounds(std::vector<double>& theta) const;

    // The largest of |h|, |g1|, |g2| at theta, g without its domain gate; NaN if any is NaN.
    double largestResidual(const std::vector<double>& theta) const;

  private:
    double mSampleSize;
    double mAlpha;
    double mProportion;
};

// Limits K x sample mean. `location` holds the mean, `scale` stays NaN, and a two-sided request
// also reports the solution's scale-ratio bounds (x1, x2) in `auxiliary`. Always returns 0.
class ExponentialModelTI : public ToleranceInterval {
  public:
    ExponentialModelTI(const double* observations, uint32_t count, double alphaLevel,
                       double proportionToCover, kel_ConfidenceType type);

    // -ln(v) and -ln(1 - v) from the maximiser's v. Estimates that do not solve the equations
    // (see solvesEquations) are refined by Newton steps on the equations; when no solution
    // inside g's domain comes of it (the true v lies in the band v ~ 1 that the objective treats
    // as invalid, as for n = 2 at confidence 0.99), both factors and both auxiliary values are
    // NaN. Matrix-library exceptions inside the solve end in the same NaN.
    void calcKFactors() override;

    // 2n (-ln p) / chi2inv(1 - alpha) for the lower bound, 2n (-ln(1 - p)) / chi2inv(alpha) for
    // the upper, with 2n degrees of freedom. Untouched for an empty sample.
    void calcKFactor(double& k, bool upper) const override;

    // The lower one-sided factor for any alpha and proportion.
    void calcLowerKFactor(double alphaLevel, double proportionToCover, double& k) const;

    // Sample mean into location (whatever the companion leaves for fewer than two observations).
    int32_t estimateTIBasedParameters() override;

    // K x mean for the limits asked for; no test of the sample size, no back-transform.
    void calcToleranceInterval() override;
};

// The two-sided factors from the maximiser's v: -ln v (+0 for v = 1 exactly, never -0), and
// -ln(1 - e^(-lower)), NaN when 1 - e^(-lower) is 0 within the fuzz.
void exponentialFactorsFromV(double v, double& lowerFactor, double& upperFactor);

}  // namespace kelstat

#endif  // KELSTAT_TOLERANCE_EXPONENTIAL_MODEL_H
