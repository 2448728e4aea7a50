// Models reduced to the normal one by a transform of the observations: the lognormal (natural
// logarithms, limits exponentiated) and the gamma (cube roots after Wilson and Hilferty, limits
// cubed).
#ifndef KELSTAT_TOLERANCE_LOGNORMAL_GAMMA_MODELS_H
#define KELSTAT_TOLERANCE_LOGNORMAL_GAMMA_MODELS_H

#include "tolerance/normal_model.h"

namespace kelstat {

// location and scale report the mean and standard deviation of the logarithms.
class LogNormalModelTI : public NormalModelTI {
  public:
    LogNormalModelTI(const double* observations, uint32_t count, double alphaLevel,
                     double proportionToCover, kel_ConfidenceType type);

    // Takes logarithms (unscreened), then the normal estimates of them. Always 0.
    int32_t estimateTIBasedParameters() override;
};

// K-factors and limits come from the normal model on the cube roots; location and scale report
// the maximum-likelihood gamma fit of the raw observations (shape and scale respectively).
class GammaModelTI : public NormalModelTI {
  public:
    GammaModelTI(const double* observations, uint32_t count, double alphaLevel,
                 double proportionToCover, kel_ConfidenceType type);

    // Fits the raw observations, then takes cube roots and their normal estimates. Returns the
    // fit's code; the rest of the request runs whatever it is.
    int32_t estimateTIBasedParameters() override;

    // Cube root of every observation (a negative one becomes NaN).
    void transformData() override;

    // Cubes both limits, NaN or not.
    void backTransformTolLimits(double* lower, double* upper) const override;

    // Reports the fit: location = fit[1] (shape), scale = fit[0] (scale); both NaN when every
    // observation was equal.
    void backTransFormEstimates() override;

    double fittedParameters[2] = {kNaN, kNaN};
    double rawStandardDeviation = kNaN;
};

}  // namespace kelstat

#endif  // KELSTAT_TOLERANCE_LOGNORMAL_GAMMA_MODELS_H
