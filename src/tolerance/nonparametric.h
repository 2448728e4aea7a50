// Distribution-free tolerance limits: two order statistics of the sorted sample, and the
// confidence they actually achieve.
#ifndef KELSTAT_TOLERANCE_NONPARAMETRIC_H
#define KELSTAT_TOLERANCE_NONPARAMETRIC_H

#include "numerics/real_function.h"
#include "tolerance/tolerance_interval.h"

namespace kelstat {

// f(x) = I_{1-q}(x, n - x + 1) + c - 1 for 0 < x < n + 1, c at and below 0, c - 1 at and above
// n + 1. It falls from c to c - 1, so for 0 < c < 1 it has one root in [0, n + 1]: the
// continuous order-statistic index at which the beta probability reaches its target.
class BetaCdfFuncForTI : public ZRXRealFunction {
  public:
    BetaCdfFuncForTI(double sampleSize, double q, double c);
    double operator()(double x) override;

  private:
    double mSampleSize;
    double mQ;
    double mC;
};

class NonParametricTI : public ToleranceInterval {
  public:
    // The observations must be sorted ascending: element i is taken as the (i+1)-th order
    // statistic.
    NonParametricTI(const double* observations, uint32_t count, double alphaLevel,
                    double proportionToCover, kel_ConfidenceType type);

    // Index-only form: the limits come out as the zero-based indices of the order statistics.
    NonParametricTI(uint32_t count, double alphaLevel, double proportionToCover,
                    kel_ConfidenceType type);

    void calcKFactors() override {}
    void calcKFactor(double& /*k*/, bool /*upper*/) const override {}
    int32_t estimateTIBasedParameters() override { return 0; }

    // Both limits for every confidence type (for a one-sided request, the lower and the upper
    // bound at that confidence), and the achieved confidence. Nothing for n outside
    // 2..2147000000; both limits NaN when an index falls outside the sample.
    void calcToleranceInterval() override;

    // One-based lower and upper order-statistic indices for sample size n, and the confidence
    // they achieve in percent.
    void calcNPTIIndices(uint32_t n, uint32_t* lowerIndex, uint32_t* upperIndex,
                         double* achieved) const;
};

}  // namespace kelstat

#endif  // KELSTAT_TOLERANCE_NONPARAMETRIC_H
