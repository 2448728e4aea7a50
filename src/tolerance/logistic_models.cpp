#include "tolerance/logistic_models.h"

#include <cmath>

#include "qdr.h"

namespace kelstat {

namespace {

constexpr std::size_t kFitSize = 2;
constexpr std::size_t kCovarianceCount = 3;

}  // namespace

LogisticModelTI::LogisticModelTI(const double* observations, uint32_t count, double alphaLevel,
                                 double proportionToCover, kel_ConfidenceType type)
    : ToleranceInterval(observations, count, alphaLevel, proportionToCover, type) {}

int32_t LogisticModelTI::estimateTIBasedParameters() {
    double fit[kFitSize] = {0.0, 0.0};
    covariances.assign(kCovarianceCount, 0.0);
    const int32_t code =
        qdr_FitLogisticWithCovariances(data.data(), fit, covariances.data(), sampleSize);
    location = fit[0];
    scale = fit[1];
    return code;
}

void LogisticModelTI::calcLowerKFactor(double a, double q, double& k) const {
    if (sampleSize < 2 || std::isnan(location) || std::isnan(scale)) return;
    // A subclass that skipped estimation has no covariances: nothing to form a bound from.
    if (covariances.size() < kCovarianceCount) return;
    const double n = sampleSize;
    const double w = qdr_GetLogisticInvCdf(1.0 - q, 0.0, 1.0);
    const double variance = covariances[0] + 2.0 * w * covariances[1] + w * w * covariances[2];
    // This order of operations (not V / sigma^2) is part of the factor's definition: it fixes
    // the rounding that reference values carry.
    const double standardError = std::sqrt(variance * (n / (scale * scale)) / n);
    k = qdr_GetNormalInvCdf(1.0 - a, 0.0, 1.0) * standardError - w;
}

void LogisticModelTI::calcKFactors() {
    calcLowerKFactor(alpha / 2.0, (1.0 + proportion) / 2.0, lowerKFactor);
    upperKFactor = lowerKFactor;
}

void LogisticModelTI::calcKFactor(double& k, bool) const {
    calcLowerKFactor(alpha, proportion, k);
}

void LogisticModelTI::backTransFormEstimates() {
    if (scale == 0.0) {
        location = kNaN;
        scale = kNaN;
    }
}

LogLogisticModelTI::LogLogisticModelTI(const double* observations, uint32_t count,
                                       double alphaLevel, double proportionToCover,
                                       kel_ConfidenceType type)
    : LogisticModelTI(observations, count, alphaLevel, proportionToCover, type) {
    logTransformed = true;
}

int32_t LogLogisticModelTI::estimateTIBasedParameters() {
    transformData();
    return LogisticModelTI::estimateTIBasedParameters();
}

}  // namespace kelstat
