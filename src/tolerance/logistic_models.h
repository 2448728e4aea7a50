// Logistic and log-logistic models: each limit is a large-sample (Wald) confidence bound on a
// population quantile, formed from the maximum-likelihood fit and the covariances of its estimates.
#ifndef KELSTAT_TOLERANCE_LOGISTIC_MODELS_H
#define KELSTAT_TOLERANCE_LOGISTIC_MODELS_H

#include <vector>

#include "tolerance/tolerance_interval.h"

namespace kelstat {

// Limits location -/+ K x scale from a logistic fit (mu, sigma). The two-sided interval puts a
// bound at confidence 1 - alpha/2 on each of the quantiles (1 -/+ p)/2, so both factors are equal.
class LogisticModelTI : public ToleranceInterval {
  public:
    LogisticModelTI(const double* observations, uint32_t count, double alphaLevel,
                    double proportionToCover, kel_ConfidenceType type);

    // K for (alpha/2, (1 + p)/2) into lowerKFactor, copied to upperKFactor (NaN included).
    void calcKFactors() override;

    // K for (alpha, p); the same for either bound, the logistic being symmetric.
    void calcKFactor(double& k, bool upper) const override;

    // The fit's estimates and covariances; returns the fit's code unchanged.
    int32_t estimateTIBasedParameters() override;

    // A zero scale estimate cannot describe a population: both estimates become NaN. This runs
    // after the limits, so it does not change them.
    void backTransFormEstimates() override;

    // The factor of a bound at confidence 1 - a on the quantile with a fraction 1 - q beyond it:
    // K = z(1 - a) se - w, w = logit(1 - q), se the standard error of mu + w sigma in units of
    // sigma. k is left as it is for fewer than two observations or NaN estimates.
    void calcLowerKFactor(double a, double q, double& k) const;

    // Var(mu), Cov(mu, sigma), Var(sigma) as the fit returned them; empty until estimated.
    std::vector<double> covariances;
};

// The logistic model on the natural logarithms of the observations, limits exponentiated. The
// estimates stay those of the fit to the logarithms. Observations <= 0 are not screened.
class LogLogisticModelTI : public LogisticModelTI {
  public:
    LogLogisticModelTI(const double* observations, uint32_t count, double alphaLevel,
                       double proportionToCover, kel_ConfidenceType type);

    int32_t estimateTIBasedParameters() override;
};

}  // namespace kelstat

#endif  // KELSTAT_TOLERANCE_LOGISTIC_MODELS_H
