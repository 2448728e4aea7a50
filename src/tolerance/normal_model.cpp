#include "tolerance/normal_model.h"

#include <cmath>
#include <cstddef>
#include <iterator>
#include <limits>

#include "numerics/gauss_legendre.h"
#include "numerics/root_finder.h"
#include "qdr.h"
#include "tolerance/gauss_legendre_36_table.h"

namespace kelstat {

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// The coverage integral runs over the standardized mean from 0 to 8.3 standard errors; beyond
// that the normal density is below 1e-15 and adds nothing the root can see.
constexpr double kIntegrationLower = 0.0;
constexpr double kIntegrationUpper = 8.3;

// G tends to alpha > 0 as t -> 0 and to alpha - 1 < 0 as t grows, so the widening loops end
// after a few steps for any sensible request. The cap leaves room for a few hundred steps from
// a poor start (past the tenth step the downward loop only creeps); beyond it the request is
// hopeless (a proportion or confidence of 0 or 1): NaN.
constexpr int kMaxBracketSteps = 1000;

// Smallest t the downward widening tries; from the eleventh step on it creeps below this.
constexpr double kSmallestInverseK = 1e-12;

// (n - 1) r^2(x): the quantile part of the integrand, independent of t.
double scaledSquaredRadius(double x, double sampleSize, double proportion) {
    const double squaredRadius = qdr_GetChiSqInvCdf(proportion, 1.0, x * x / sampleSize);
    return (sampleSize - 1.0) * squaredRadius;
}

// P(chi-square with n - 1 degrees of freedom > (n - 1) r^2 t^2).
double coverageProbability(double scaledRadius, double sampleSize, double inverseKSquared) {
    return qdr_GetChiSqCdf(QDR_UPPER_TAIL, scaledRadius * inverseKSquared, sampleSize - 1.0, 0.0);
}

}  // namespace

// --- NormalKFactorIntegrand -----------------------------------------------------------------

NormalKFactorIntegrand::NormalKFactorIntegrand(double sampleSize, double proportion,
                                               double inverseK)
    : mSampleSize(sampleSize), mProportion(proportion), mInverseK(inverseK) {}

double NormalKFactorIntegrand::operator()(double x) {
    const double scaledRadius = scaledSquaredRadius(x, mSampleSize, mProportion);
    const double coverage = coverageProbability(scaledRadius, mSampleSize, mInverseK * mInverseK);
    return coverage * qdr_GetNormalPdf(x, 0.0, 1.0);
}

// --- NormalKFactorIntegralFunction ----------------------------------------------------------

NormalKFactorIntegralFunction::NormalKFactorIntegralFunction(double sampleSize, double proportion,
                                                             double alphaLevel)
    : mSampleSize(sampleSize), mProportion(proportion), mAlpha(alphaLevel) {
    // The rule is findGaussianQuadratureWeights(36) stored bit for bit, not rebuilt per call.
    mNodes.reserve(std::size(kNormalKFactorRule));
    mWeights.reserve(std::size(kNormalKFactorRule));
    for (const GaussLegendrePair& pair : kNormalKFactorRule) {
        mNodes.push_back(pair.node);
        mWeights.push_back(pair.weight);
    }
}

void NormalKFactorIntegralFunction::cacheNodeValues() {
    // The points are formed exactly as the quadrature routine forms them.
    const double half = 0.5 * (kIntegrationUpper - kIntegrationLower);
    const double mid = 0.5 * (kIntegrationLower + kIntegrationUpper);
    mScaledSquaredRadius.resize(2 * mNodes.size());
    mDensity.resize(2 * mNodes.size());
    for (std::size_t pair = 0; pair < mNodes.size(); ++pair) {
        const double offset = mNodes[pair] * half;
        const double points[2] = {mid + offset, mid - offset};
        for (std::size_t side = 0; side < 2; ++side) {
            mScaledSquaredRadius[2 * pair + side] =
                scaledSquaredRadius(points[side], mSampleSize, mProportion);
            mDensity[2 * pair + side] = qdr_GetNormalPdf(points[side], 0.0, 1.0);
        }
    }
}

double NormalKFactorIntegralFunction::operator()(double inverseK) {
    if (mDensity.empty()) return evaluateAfresh(inverseK);
    for (int slot = 0; slot < 2; ++slot) {
        if (mRecentInverseK[slot] == inverseK) return mRecentValue[slot];
    }
    const double half = 0.5 * (kIntegrationUpper - kIntegrationLower);
    const double inverseKSquared = inverseK * inverseK;
    double sum = 0.0;
    for (std::size_t pair = 0; pair < mNodes.size(); ++pair) {
        const double plus =
            coverageProbability(mScaledSquaredRadius[2 * pair], mSampleSize, inverseKSquared) *
            mDensity[2 * pair];
        const double minus =
            coverageProbability(mScaledSquaredRadius[2 * pair + 1], mSampleSize, inverseKSquared) *
            mDensity[2 * pair + 1];
        sum = sum + mWeights[pair] * (plus + minus);
    }
    const double integral = half * sum;
    const double value = 2.0 * integral - 1.0 + mAlpha;
    mRecentInverseK[1] = mRecentInverseK[0];
    mRecentValue[1] = mRecentValue[0];
    mRecentInverseK[0] = inverseK;
    mRecentValue[0] = value;
    return value;
}

double NormalKFactorIntegralFunction::evaluateAfresh(double inverseK) {
    NormalKFactorIntegrand integrand(mSampleSize, mProportion, inverseK);
    const double integral =
        calcGaussianIntegration(kIntegrationLower, kIntegrationUpper, mNodes, mWeights, integrand);
    return 2.0 * integral - 1.0 + mAlpha;
}

// --- K-factors ------------------------------------------------------------------------------

namespace {

struct Bracket {
    double low;
    double high;
};

// g1 = G(t1) < 0: even the larger starting factor is too small, so t must come down.
bool widenDownward(NormalKFactorIntegralFunction& equation, double t1, Bracket& bracket) {
    double high = t1;
    double t = 0.9 * t1;
    for (int step = 1; step <= kMaxBracketSteps; ++step) {
        const double g = equation(t);
        if (std::isnan(g) || g >= 0.0) {
            bracket = {t, high};
            return true;
        }
        high = t;
        if (step < 11) {
            const double next = 0.9 * t;
            t = std::isnan(next) ? kSmallestInverseK : std::fmax(kSmallestInverseK, next);
        } else {
            t = kSmallestInverseK / step;
        }
    }
    return false;
}

// g2 = G(t2) > 0: even the smaller starting factor is too large, so t must go up.
bool widenUpward(NormalKFactorIntegralFunction& equation, double t2, Bracket& bracket) {
    double low = t2;
    double t = 1.1 * t2;
    for (int step = 1; step <= kMaxBracketSteps; ++step) {
        const double g = equation(t);
        if (std::isnan(g) || g <= 0.0) {
            bracket = {low, t};
            return true;
        }
        low = t;
        t = step > 10 ? 2.2 * t : 1.1 * t;
    }
    return false;
}

}  // namespace

double normalTwoSidedKFactor(double sampleSize, double alphaLevel, double proportion,
                             bool reuseNodeValues) {
    NormalKFactorIntegralFunction equation(sampleSize, proportion, alphaLevel);
    if (!(sampleSize >= 2.0)) return kNaN;
    const double n = sampleSize;
    const double degrees = n - 1.0;

    // Starting values from two classical approximations: a chi-square bound k1 and a
    // normal-quantile form k2 with a second-order correction.
    double chiSquare = qdr_GetChiSqInvCdf(alphaLevel, degrees, 0.0);
    const bool chiSquareFailed = std::isnan(chiSquare);
    if (chiSquareFailed) {
        chiSquare =
            qdr_GetNormalInvCdf(alphaLevel, 0.0, 1.0) * std::sqrt(2.0 * degrees) + (n - 1.0);
    }
    const double k1 = std::sqrt(degrees * qdr_GetChiSqInvCdf(proportion, 1.0, 1.0 / n) / chiSquare);
    const double w = ((1.0 + 1.0 / n) * degrees / chiSquare) *
                     (1.0 + (n - 3.0 - chiSquare) / (2.0 * (n + 1.0) * (n + 1.0)));
    const double k2 = w > 0.0
                          ? qdr_GetNormalInvCdf((proportion + 1.0) * 0.5, 0.0, 1.0) * std::sqrt(w)
                          : k1 + 0.02;
    const double largerK = std::fmax(k1, k2);
    const double smallerK = std::fmin(k1, k2);
    if (chiSquareFailed) return largerK;

    const double t1 = 1.0 / largerK;
    const double t2 = 1.0 / smallerK;
    if (reuseNodeValues) equation.cacheNodeValues();

    const double g1 = equation(t1);
    if (std::isnan(g1) || equalWithinFuzz(g1, 0.0, 0.0)) return largerK;
    const double g2 = equation(t2);
    if (equalWithinFuzz(g2, 0.0, 0.0)) return smallerK;

    Bracket bracket{t1, t2};
    if (g1 < 0.0) {
        if (!widenDownward(equation, t1, bracket)) return kNaN;
    } else if (g2 > 0.0) {
        if (!widenUpward(equation, t2, bracket)) return kNaN;
    }
    const double root = ZRXRootFinder(bracket.low, bracket.high, equation);
    return 1.0 / root;
}

double normalOneSidedKFactor(double sampleSize, double alphaLevel, double proportion) {
    if (!(sampleSize >= 2.0)) return kNaN;
    const double rootN = std::sqrt(sampleSize);
    const double noncentrality = qdr_GetNormalInvCdf(proportion, 0.0, 1.0) * rootN;
    return qdr_GetTInvCdf(1.0 - alphaLevel, sampleSize - 1.0, noncentrality) / rootN;
}

// --- NormalModelTI --------------------------------------------------------------------------

NormalModelTI::NormalModelTI(const double* observations, uint32_t count, double alphaLevel,
                             double proportionToCover, kel_ConfidenceType type)
    : ToleranceInterval(observations, count, alphaLevel, proportionToCover, type) {}

NormalModelTI::NormalModelTI(uint32_t count, double mean, double standardDeviation,
                             double alphaLevel, double proportionToCover, kel_ConfidenceType type) {
    sampleSize = count;
    location = mean;
    scale = standardDeviation;
    alpha = alphaLevel;
    proportion = proportionToCover;
    confidenceType = type;
}

int32_t NormalModelTI::estimateTIBasedParameters() {
    if (data.empty()) return 0;
    qdr_GetSampleMeanAndVariance(data.data(), static_cast<unsigned>(data.size()), &location,
                                 &scale);
    scale = std::sqrt(scale);
    return 0;
}

void NormalModelTI::calcKFactor(double& k, bool /*upper*/) const {
    k = normalOneSidedKFactor(static_cast<double>(sampleSize), alpha, proportion);
}

void NormalModelTI::calcKFactors() {
    const double k = normalTwoSidedKFactor(static_cast<double>(sampleSize), alpha, proportion);
    lowerKFactor = k;
    upperKFactor = k;
}

}  // namespace kelstat
