// The smallest-extreme-value model and the two models that reuse it on transformed data: the
// largest extreme value (negated observations) and the Weibull (logarithms).
//
// Every K-factor solves one integral equation in k: with a_i the standardized residuals of the
// fit, c their sum, S(z) = (1/n) sum exp(a_i z) and the density
//   g(z) = exp(c (z - 1)) (z / S(z))^n / z^2   (n >= 3, z > 0; 0 for z <= 0),
//   g(z) = exp(c (z - 1)) / S(z)^2             (n = 2),
// the integral of g(z) / I times P(Gamma(n, 1) <= -ln(p) exp(-k z) n S(z)) over the range where g
// is not negligible equals 1 - alpha, I being the integral of g itself. The integrals use the
// 120-point Gauss-Legendre rule; the root is bracketed from a noncentral-t start.
#ifndef KELSTAT_TOLERANCE_EXTREME_VALUE_MODELS_H
#define KELSTAT_TOLERANCE_EXTREME_VALUE_MODELS_H

#include <cstdint>
#include <limits>
#include <vector>

#include "numerics/real_function.h"
#include "tolerance/tolerance_interval.h"

namespace kelstat {

// mMultiplier x g(z), n being the number of residuals (none gives 0). The mode search hands in
// the multiplier -1 so that a minimiser finds the peak of g.
class SEVKFNormalizingConstIntegrand : public ZRXRealFunction {
  public:
    SEVKFNormalizingConstIntegrand(double sumOfResiduals, std::vector<double> residuals,
                                   double multiplier = 1.0);
    double operator()(double z) override;
    void setMultiplier(double multiplier) { mMultiplier = multiplier; }

  private:
    double mSumOfResiduals;
    std::vector<double> mResiduals;
    double mMultiplier;
};

// H(z; k) = (mNormalizingConstant x G) x g(z) with G = P(Gamma(n, 1) <= -ln(p) exp(-k z) n S(z)).
// G is evaluated at every z, also where g is 0.
class SExtremeKFactorIntegrand : public ZRXRealFunction {
  public:
    SExtremeKFactorIntegrand(double proportion, double k, double sumOfResiduals,
                             double normalizingConstant, std::vector<double> residuals);
    double operator()(double z) override;

  private:
    double mProportion;
    double mK;
    double mSumOfResiduals;
    double mNormalizingConstant;
    std::vector<double> mResiduals;
};

// The values of S and g at the 120 points of the rule on one integration range, formed point by
// point exactly as the integrands form them. Entries 2j and 2j + 1 belong to mid + offset_j and
// mid - offset_j, the order in which the quadrature routine visits them.
//
// The logarithms of S, g and the pair weights serve only to bound a point's term from above, so
// that an evaluation can leave out terms too small to change the sum's bits.
struct SevNodeValues {
    std::vector<double> points;
    std::vector<double> means;
    std::vector<double> densities;
    std::vector<double> logMeans;
    std::vector<double> logDensities;
    std::vector<double> logWeights;
};

// F(k) = (Q + (-1.0)) + alpha, Q the 120-point integral of H(z; k) over the integration range:
// decreasing in k from alpha to alpha - 1.
//
// With node values attached (useNodeValues), an evaluation reads S and g from them instead of
// recomputing n exponentials per point; the arithmetic and its order are those of a fresh
// SExtremeKFactorIntegrand, so the value has the same bits as evaluateAfresh().
class SExtremeKFactorIntegralFunction : public ZRXRealFunction {
  public:
    SExtremeKFactorIntegralFunction(std::vector<double> residuals, double proportion,
                                    double alphaLevel, double sumOfResiduals,
                                    double normalizingConstant, double lowerIntegrationLimit,
                                    double upperIntegrationLimit, std::vector<double> nodes,
                                    std::vector<double> weights);
    double operator()(double k) override;

    // The values must belong to this range and rule and outlive the object.
    void useNodeValues(const SevNodeValues* values);

    double evaluateAfresh(double k);

  private:
    double evaluateFromNodeValues(double k) const;

    std::vector<double> mResiduals;
    double mProportion;
    double mAlpha;
    double mSumOfResiduals;
    double mNormalizingConstant;
    double mLowerIntegrationLimit;
    double mUpperIntegrationLimit;
    std::vector<double> mNodes;
    std::vector<double> mWeights;
    const SevNodeValues* mNodeValues = nullptr;
    // -ln p, and the constants of the bounds that let an evaluation leave out terms too small to
    // change the sum (per point: ln of the bound from G <= 1, ln of -ln(p) n S(z), and the constant
    // of the lower-tail bound), formed once by useNodeValues.
    double mMinusLogProportion = std::numeric_limits<double>::quiet_NaN();
    std::vector<double> mUnitBounds;
    std::vector<double> mLogScaledMeans;
    std::vector<double> mLowerTailBounds;
    // Scratch for the gamma arguments of one evaluation.
    mutable std::vector<double> mArguments;
    // The root finder starts by evaluating the bracket ends that the bracket search has just
    // evaluated; the last two values are handed back unchanged.
    double mRecentK[2];
    double mRecentValue[2];
};

// How calcLowerKFactor evaluates its equation. kReuseNodeValues computes S and g at the quadrature
// points once per equation, and falls back to a logarithmic form of g where the direct one is not
// finite (large samples); kStraightforward evaluates every integrand afresh through the function
// objects, in the direct form only. Wherever the direct form is finite both give the same bits.
enum class SevEvaluation { kReuseNodeValues, kStraightforward };

// The integration range of the K-factor equation for these residuals as the model uses it:
// logarithmic is set when the direct form of g was not finite on the first range and the range
// was found again from the logarithmic form. NaN ends when a range scan reached its cap.
struct SevIntegrationRange {
    double lower;
    double upper;
    bool logarithmic;
};
SevIntegrationRange sevIntegrationRange(const std::vector<double>& residuals);

// F at each k for these residuals, through the node values (which leave out terms too small to
// change the sum) and afresh through the function objects: the two must agree bit for bit.
struct SevEquationValue {
    double fromNodeValues;
    double afresh;
};
std::vector<SevEquationValue> sevEquationValues(const std::vector<double>& residuals,
                                                double alphaLevel, double proportion,
                                                const std::vector<double>& ks);

// Distribution code 4. location and scale are those of the fit; limits location -/+ K x scale.
class SExtremeValueModelTI : public ToleranceInterval {
  public:
    SExtremeValueModelTI(const double* observations, uint32_t count, double alphaLevel,
                         double proportionToCover, kel_ConfidenceType type);

    // Lower: one-sided at (alpha / 2, (1 + p) / 2); upper: one-sided upper at the same levels.
    // The range and normalising integral are found once for both.
    void calcKFactors() override;

    // Lower bound: calcLowerKFactor(alpha, p, k, -1); upper: (1 - alpha, 1 - p, k, +1).
    void calcKFactor(double& k, bool upper) const override;

    // Maximum-likelihood smallest-extreme-value fit of data as it stands; returns its code and
    // leaves location and scale as the fit left them.
    int32_t estimateTIBasedParameters() override;

    // k = sign x the root of F, the one-sided factor for confidence 1 - alphaLevel and proportion
    // proportionToCover of the equation above. NaN for fewer than two observations, a NaN
    // location or scale, a bracket search that meets NaN or its step cap, or a root finder that
    // fails; the noncentral-t start itself when F is 0 or NaN there.
    void calcLowerKFactor(double alphaLevel, double proportionToCover, double& k, int sign,
                          SevEvaluation evaluation = SevEvaluation::kReuseNodeValues) const;

    // The range outside which g is below 1e-12: a golden-section search for the mode, then steps
    // of 0.1 down and up from it (a coarse grid when the mode search fails to find the peak).
    // Both ends NaN when an upward grid scan reaches its cap.
    void calcIntegrationLimits(const std::vector<double>& residuals, double sumOfResiduals,
                               double* lower, double* upper) const;

    // The 60 positive nodes (increasing) and their weights of the 120-point rule; the vectors'
    // previous contents are discarded.
    void getGaussLegendreWeights(std::vector<double>& nodes, std::vector<double>& weights) const;
};

// Distribution code 5: the smallest-extreme-value model on the negated sample, its results
// negated back, which exchanges the roles of the lower and upper factors. location and scale are
// the largest-extreme-value estimates.
class LExtremeValueModelTI : public SExtremeValueModelTI {
  public:
    LExtremeValueModelTI(const double* observations, uint32_t count, double alphaLevel,
                         double proportionToCover, kel_ConfidenceType type);

    void calcKFactor(double& k, bool upper) const override;
    int32_t estimateTIBasedParameters() override;
    // Changes the sign of every observation (0 becomes -0; nothing is rounded).
    void transformData() override;
    void backTransFormEstimates() override;
    // Limits of the negated sample, negated; no test of the sample size and no back-transform.
    void calcToleranceInterval() override;
};

// Distribution code 3: the smallest-extreme-value model on the logarithms, limits exponentiated.
// location reports the Weibull scale exp(mu) and scale the Weibull shape 1 / sigma; the
// K-factors stay on the log scale.
class WeibullModelTI : public SExtremeValueModelTI {
  public:
    WeibullModelTI(const double* observations, uint32_t count, double alphaLevel,
                   double proportionToCover, kel_ConfidenceType type);

    // Logarithms (unscreened: 0 gives -inf, negatives NaN), then the fit; returns its code.
    int32_t estimateTIBasedParameters() override;
    // NaN shape when the log-scale sigma is zero within fuzz or the location is NaN.
    void backTransFormEstimates() override;
};

}  // namespace kelstat

#endif  // KELSTAT_TOLERANCE_EXTREME_VALUE_MODELS_H
