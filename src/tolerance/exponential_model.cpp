#include "tolerance/exponential_model.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "matrix/allege.h"
#include "matrix/matrix_exceptions.h"
#include "numerics/real_function.h"
#include "qdr.h"

namespace kelstat {

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

constexpr int kParameterCount = 3;
// Newton steps from the starting estimates reach the solution in about ten iterations; the cap
// only bounds a run that wanders.
constexpr int kMaxIterations = 1000;

// x2 for n <= 1 when v rounds to 1: a ratio bound no sample could reach.
constexpr double kUnboundedRatio = 1.001e18;

double chiSquareQuantile(double probability, double degreesOfFreedom) {
    return qdr_GetChiSqInvCdf(probability, degreesOfFreedom, 0.0);
}

}  // namespace

// --- ExponentialTSKFactorHelper ---------------------------------------------------------------

ExponentialTSKFactorHelper::ExponentialTSKFactorHelper(double sampleSize, double alphaLevel,
                                                       double proportion)
    : mSampleSize(sampleSize), mAlpha(alphaLevel), mProportion(proportion) {}

double ExponentialTSKFactorHelper::mH(double x1, double x2) const {
    const double m = mSampleSize + mSampleSize;
    const double upper = qdr_GetChiSqCdf(QDR_LOWER_TAIL, m * x2, m, 0.0);
    const double lower = qdr_GetChiSqCdf(QDR_LOWER_TAIL, m * x1, m, 0.0);
    return ((upper - lower) + (-1.0)) + mAlpha;
}

double ExponentialTSKFactorHelper::mG(double x, double v, bool* valid) const {
    *valid = true;
    if (v > 1.0) {
        *valid = false;
        return 0.0;
    }
    if (x < 0.0 || v < 0.0 || equalWithinFuzz(v, 1.0, 0.0)) {
        *valid = false;
        return 0.0;
    }
    return (std::pow(v, x) - std::pow(1.0 - v, x)) - mProportion;
}

void ExponentialTSKFactorHelper::mHDerivatives(double x1, double x2, std::vector<double>& d) const {
    d.assign(2, 0.0);
    const double m = mSampleSize + mSampleSize;
    d[0] = -(qdr_GetChiSqPdf(m * x1, m) * m);
    d[1] = qdr_GetChiSqPdf(m * x2, m) * m;
}

void ExponentialTSKFactorHelper::mGDerivatives(double x, double v, std::vector<double>& d) const {
    d.assign(2, 0.0);
    const double complement = 1.0 - v;
    d[0] = std::log(v) * std::pow(v, x) - std::log(complement) * std::pow(complement, x);
    d[1] = (std::pow(v, x - 1.0) + std::pow(complement, x - 1.0)) * x;
}

void ExponentialTSKFactorHelper::mHSecDerivatives(double x1, double x2,
                                                  std::vector<double>& d) const {
    d.assign(2, 0.0);
    const double n = mSampleSize;
    const double m = n + n;
    d[0] = qdr_GetChiSqPdf(m * x1, m) * (((n - 1.0) / (n * x1) + (-1.0)) * (n * n * (-2.0)));
    d[1] = qdr_GetChiSqPdf(m * x2, m) * (((n - 1.0) / (n * x2) - 1.0) * (n * n + n * n));
}

void ExponentialTSKFactorHelper::mGSecDerivatives(double x, double v,
                                                  std::vector<double>& d) const {
    d.assign(3, 0.0);
    const double complement = 1.0 - v;
    const double logV = std::log(v);
    const double logComplement = std::log(complement);
    d[0] = logV * logV * std::pow(v, x) - logComplement * logComplement * std::pow(complement, x);
    d[1] = (std::pow(v, x - 2.0) - std::pow(complement, x - 2.0)) * ((x - 1.0) * x);
    d[2] = x * (logComplement * std::pow(complement, x - 1.0) + logV * std::pow(v, x - 1.0)) +
           (std::pow(v, x - 1.0) + std::pow(complement, x - 1.0));
}

double ExponentialTSKFactorHelper::calculateFunction(const std::vector<double>& theta, bool* valid,
                                                     int* parameterIndex, int) const {
    *valid = true;
    *parameterIndex = -1;
    const double h = mH(theta[0], theta[1]);
    double f = -(h * h);
    const double g1 = mG(theta[0], theta[2], valid);
    f = f - g1 * g1;
    const double g2 = mG(theta[1], theta[2], valid);
    f = f - g2 * g2;
    return f;
}

void ExponentialTSKFactorHelper::calculateFirstDerivative(const std::vector<double>& theta,
                                                          std::vector<double>& gradient,
                                                          bool* valid) const {
    gradient.assign(kParameterCount, 0.0);
    const double x1 = theta[0];
    const double x2 = theta[1];
    const double v = theta[2];
    const double g1 = mG(x1, v, valid);
    const double g2 = mG(x2, v, valid);
    if (!*valid) return;

    // alpha + (...) in place of (...) + alpha: one addition of the same two terms, same bits.
    const double h = mH(x1, x2);
    std::vector<double> dH;
    std::vector<double> dG1;
    std::vector<double> dG2;
    mHDerivatives(x1, x2, dH);
    mGDerivatives(x1, v, dG1);
    mGDerivatives(x2, v, dG2);
    gradient[0] = (dG1[0] * g1 + dH[0] * h) * (-2.0);
    gradient[1] = (dG2[0] * g2 + dH[1] * h) * (-2.0);
    gradient[2] = (dG2[1] * g2 + dG1[1] * g1) * (-2.0);
}

void ExponentialTSKFactorHelper::calculateNegSecondDerivative(const std::vector<double>& theta,
                                                              const std::vector<double>&,
                                                              SymmetricMatrix& negHessian,
                                                              bool* valid) const {
    const double x1 = theta[0];
    const double x2 = theta[1];
    const double v = theta[2];
    *valid = true;
    const double g1 = mG(x1, v, valid);
    const double g2 = mG(x2, v, valid);

    const double h = mH(x1, x2);
    std::vector<double> dH;
    std::vector<double> dG1;
    std::vector<double> dG2;
    std::vector<double> d2H;
    std::vector<double> d2G1;
    std::vector<double> d2G2;
    mHDerivatives(x1, x2, dH);
    mGDerivatives(x1, v, dG1);
    mGDerivatives(x2, v, dG2);
    mHSecDerivatives(x1, x2, d2H);
    mGSecDerivatives(x1, v, d2G1);
    mGSecDerivatives(x2, v, d2G2);

    negHessian.resize(kParameterCount, 0.0);
    const double x1x1 = dG1[0] * dG1[0] + (d2G1[0] * g1 + (dH[0] * dH[0] + d2H[0] * h));
    const double x2x2 = dG2[0] * dG2[0] + (d2G2[0] * g2 + (dH[1] * dH[1] + d2H[1] * h));
    const double vv = dG2[1] * dG2[1] + (d2G2[1] * g2 + (dG1[1] * dG1[1] + d2G1[1] * g1));
    const double x1v = dG1[0] * dG1[1] + g1 * d2G1[2];
    const double x2v = dG2[0] * dG2[1] + g2 * d2G2[2];
    negHessian(0, 0) = x1x1 + x1x1;
    negHessian(1, 1) = x2x2 + x2x2;
    negHessian(2, 2) = vv + vv;
    negHessian(1, 0) = (dH[0] + dH[0]) * dH[1];
    negHessian(2, 0) = x1v + x1v;
    negHessian(2, 1) = x2v + x2v;
}

void ExponentialTSKFactorHelper::calculateStartingEstimates(std::vector<double>& theta) const {
    theta.assign(kParameterCount, 0.0);
    const double n = mSampleSize;
    const double m = n + n;
    const double p = mProportion;
    if (n > 1.0) {
        const double w =
            std::exp((m * std::log((p + 1.0) * 0.5)) / chiSquareQuantile(1.0 - 0.5 * mAlpha, m));
        theta[2] = w;
        theta[1] = std::log(p) / std::log(w);
        const double coverage = qdr_GetChiSqCdf(QDR_LOWER_TAIL, m * theta[1], m, 0.0);
        theta[0] = chiSquareQuantile(coverage + (mAlpha + (-1.0)), m) / m;
        return;
    }
    theta[0] = -std::log(1.0 - mAlpha);
    const double w = 1.0 / (std::pow(1.0 - p, 1.0 / theta[0]) + 1.0);
    theta[2] = w;
    theta[1] = equalWithinFuzz(w, 1.0, 0.0) ? kUnboundedRatio : std::log(p) / std::log(w);
}

bool ExponentialTSKFactorHelper::solvesEquations(const std::vector<double>& theta) const {
    if (theta.size() != static_cast<std::size_t>(kParameterCount)) return false;
    const double x1 = theta[0];
    const double x2 = theta[1];
    const double v = theta[2];
    bool inDomain = true;
    mG(x1, v, &inDomain);
    if (inDomain) mG(x2, v, &inDomain);
    if (!inDomain || !(v > 0.0) || !std::isfinite(x1) || !std::isfinite(x2)) return false;
    return largestResidual(theta) <= kSolutionTolerance;
}

namespace {

// Newton on the equations converges quadratically from where the maximiser leaves off; the caps
// bound a start far from any solution.
constexpr int kMaxRefinementSteps = 100;
// A step is halved at most this often before the refinement settles at the current point.
constexpr int kMaxRefinementHalvings = 60;

double determinant3(const double m[3][3]) {
    return m[0][0] * (m[1][1] * m[2][2] - m[1][2] * m[2][1]) -
           m[0][1] * (m[1][0] * m[2][2] - m[1][2] * m[2][0]) +
           m[0][2] * (m[1][0] * m[2][1] - m[1][1] * m[2][0]);
}

// Solves m delta = rhs by Cramer's rule; false when m is singular or not finite.
bool solve3(const double m[3][3], const double rhs[3], double delta[3]) {
    const double det = determinant3(m);
    if (!std::isfinite(det) || det == 0.0) return false;
    for (int column = 0; column < 3; ++column) {
        double replaced[3][3];
        for (int row = 0; row < 3; ++row) {
            for (int col = 0; col < 3; ++col) {
                replaced[row][col] = col == column ? rhs[row] : m[row][col];
            }
        }
        delta[column] = determinant3(replaced) / det;
    }
    return true;
}

double largestMagnitude(const double values[3]) {
    double largest = 0.0;
    for (int i = 0; i < 3; ++i) {
        if (!(std::fabs(values[i]) <= largest)) largest = std::fabs(values[i]);  // NaN sticks
    }
    return largest;
}

// g(x) = v^x - u^x - p with u = 1 - v = e^s, and its derivatives in x and s. Near v = 1 a double
// v keeps few digits of u; s keeps them all.
struct ContentTerms {
    double value;
    double dx;
    double ds;
};

ContentTerms contentInLogComplement(double x, double s, double p) {
    const double u = std::exp(s);
    const double logV = std::log1p(-u);
    const double vPower = std::exp(x * logV);
    const double uPower = std::exp(x * s);
    return {(vPower - uPower) - p, logV * vPower - s * uPower,
            -x * u * std::exp((x - 1.0) * logV) - x * uPower};
}

}  // namespace

double ExponentialTSKFactorHelper::largestResidual(const std::vector<double>& theta) const {
    const double x1 = theta[0];
    const double x2 = theta[1];
    const double v = theta[2];
    const double residuals[3] = {
        mH(x1, x2),
        (std::pow(v, x1) - std::pow(1.0 - v, x1)) - mProportion,
        (std::pow(v, x2) - std::pow(1.0 - v, x2)) - mProportion,
    };
    return largestMagnitude(residuals);
}

bool ExponentialTSKFactorHelper::refineSolution(std::vector<double>& theta) const {
    if (theta.size() != static_cast<std::size_t>(kParameterCount)) return false;
    if (!(theta[2] > 0.0 && theta[2] < 1.0)) return false;

    // First the solution itself, in (x1, x2, ln(1 - v)).
    double point[3] = {theta[0], theta[1], std::log(1.0 - theta[2])};
    const auto residualsAt = [this](const double at[3], double out[3]) {
        out[0] = mH(at[0], at[1]);
        out[1] = contentInLogComplement(at[0], at[2], mProportion).value;
        out[2] = contentInLogComplement(at[1], at[2], mProportion).value;
    };
    double residuals[3];
    residualsAt(point, residuals);
    for (int step = 0; step < kMaxRefinementSteps && largestMagnitude(residuals) > 0.0; ++step) {
        std::vector<double> dH;
        mHDerivatives(point[0], point[1], dH);
        const ContentTerms g1 = contentInLogComplement(point[0], point[2], mProportion);
        const ContentTerms g2 = contentInLogComplement(point[1], point[2], mProportion);
        const double jacobian[3][3] = {
            {dH[0], dH[1], 0.0}, {g1.dx, 0.0, g1.ds}, {0.0, g2.dx, g2.ds}};
        const double rhs[3] = {-residuals[0], -residuals[1], -residuals[2]};
        double delta[3];
        if (!solve3(jacobian, rhs, delta)) break;
        bool improved = false;
        for (int halving = 0; halving <= kMaxRefinementHalvings && !improved; ++halving) {
            const double trial[3] = {point[0] + delta[0], point[1] + delta[1], point[2] + delta[2]};
            double trialResiduals[3];
            residualsAt(trial, trialResiduals);
            if (largestMagnitude(trialResiduals) < largestMagnitude(residuals)) {
                std::copy(trial, trial + 3, point);
                std::copy(trialResiduals, trialResiduals + 3, residuals);
                improved = true;
            }
            for (double& component : delta) component *= 0.5;
        }
        if (!improved) break;
    }

    // Then the reported triple: v rounds to a double whose spacing near 1 can exceed the
    // tolerance's worth of u, so the ratio bounds are refitted to each of the doubles around it
    // and the best triple is kept.
    const double nearest = 1.0 - std::exp(point[2]);
    const double candidates[3] = {std::nextafter(nearest, 0.0), nearest,
                                  std::nextafter(nearest, 2.0)};
    std::vector<double> best;
    double bestResidual = kNaN;
    for (double v : candidates) {
        if (!(v > 0.0 && v < 1.0) || equalWithinFuzz(v, 1.0, 0.0)) continue;
        std::vector<double> candidate = {point[0], point[1], v};
        fitRatioBounds(candidate);
        const double residual = largestResidual(candidate);
        if (best.empty() || residual < bestResidual) {
            best = candidate;
            bestResidual = residual;
        }
    }
    if (best.empty()) return false;
    theta = best;
    return solvesEquations(theta);
}

void ExponentialTSKFactorHelper::fitRatioBounds(std::vector<double>& theta) const {
    const double v = theta[2];
    std::vector<double> dG;
    // x2 alone sets g2: Newton on it.
    for (int step = 0; step < kMaxRefinementSteps; ++step) {
        const double x2 = theta[1];
        const double g2 = (std::pow(v, x2) - std::pow(1.0 - v, x2)) - mProportion;
        mGDerivatives(x2, v, dG);
        const double next = x2 - g2 / dG[0];
        if (!std::isfinite(next) || next == x2) break;
        theta[1] = next;
    }
    // x1 enters both h and g1: least squares in x1 (Gauss-Newton), so that neither residual
    // carries the whole of what v's rounding leaves.
    std::vector<double> dH;
    for (int step = 0; step < kMaxRefinementSteps; ++step) {
        const double x1 = theta[0];
        const double h = mH(x1, theta[1]);
        const double g1 = (std::pow(v, x1) - std::pow(1.0 - v, x1)) - mProportion;
        mHDerivatives(x1, theta[1], dH);
        mGDerivatives(x1, v, dG);
        const double next = x1 - (dH[0] * h + dG[0] * g1) / (dH[0] * dH[0] + dG[0] * dG[0]);
        if (!std::isfinite(next) || next == x1) break;
        const double nextH = mH(next, theta[1]);
        const double nextG1 = (std::pow(v, next) - std::pow(1.0 - v, next)) - mProportion;
        if (!(nextH * nextH + nextG1 * nextG1 < h * h + g1 * g1)) break;
        theta[0] = next;
    }
}

// --- ExponentialModelTI -----------------------------------------------------------------------

void exponentialFactorsFromV(double v, double& lowerFactor, double& upperFactor) {
    // -ln(1) would be -0.
    lowerFactor = v == 1.0 ? 0.0 : -std::log(v);
    const double e = std::exp(-lowerFactor);
    upperFactor =
        equalWithinFuzz(1.0 - e, 0.0, 0.0) ? kNaN : -std::log(1.0 - std::exp(-lowerFactor));
}

ExponentialModelTI::ExponentialModelTI(const double* observations, uint32_t count,
                                       double alphaLevel, double proportionToCover,
                                       kel_ConfidenceType type)
    : ToleranceInterval(observations, count, alphaLevel, proportionToCover, type) {}

int32_t ExponentialModelTI::estimateTIBasedParameters() {
    double variance = 0.0;
    qdr_GetSampleMeanAndVariance(data.data(), static_cast<unsigned int>(data.size()), &location,
                                 &variance);
    return 0;
}

void ExponentialModelTI::calcLowerKFactor(double alphaLevel, double proportionToCover,
                                          double& k) const {
    if (sampleSize == 0) return;
    const double n = sampleSize;
    k = (std::log(proportionToCover) * (-2.0 * n)) / chiSquareQuantile(1.0 - alphaLevel, n + n);
}

void ExponentialModelTI::calcKFactor(double& k, bool upper) const {
    if (sampleSize == 0) return;
    if (!upper) {
        calcLowerKFactor(alpha, proportion, k);
        return;
    }
    const double n = sampleSize;
    // 1 - (1 - alpha), not alpha: the quantile sees alpha as the request's confidence rounds it.
    k = (std::log(1.0 - proportion) * (-2.0 * n)) / chiSquareQuantile(1.0 - (1.0 - alpha), n + n);
}

void ExponentialModelTI::calcKFactors() {
    if (sampleSize == 0) return;
    ExponentialTSKFactorHelper objective(static_cast<double>(sampleSize), alpha, proportion);
    std::vector<double> estimates;
    try {
        NewtonRaphson solver(&objective, kParameterCount, true);
        solver.mSetMaximumNumberOfIterations(kMaxIterations);
        NewtonRaphson::SymmetricMatrix covariance;
        // The outcome is judged below by the equations themselves, not by the result code.
        solver.mCalculateOptimal(estimates, covariance);
    } catch (const vek::matrix_library::MatrixException&) {
        return;
    } catch (const vek::matrix_library::MatrixSingular&) {
        return;
    } catch (const vek::allege::AllegeException&) {
        return;
    }

    // The maximiser's tolerances are loose next to the equations (a relative step of 1e-4 and an
    // absolute value change of 1e-6), so it may stop short of the solution, or on a flat stretch
    // where g is gated off. Its estimates stand whenever they already solve the equations;
    // otherwise Newton steps on the equations finish the job from them, then from the objective's
    // starting point. A solution in the band v ~ 1 stays out of reach: NaN.
    if (!objective.solvesEquations(estimates)) {
        std::vector<double> refined = estimates;
        bool solved = objective.refineSolution(refined);
        if (!solved) {
            objective.calculateStartingEstimates(refined);
            solved = objective.refineSolution(refined);
        }
        if (!solved) return;
        estimates = refined;
    }

    const double x1 = estimates[0];
    const double x2 = estimates[1];
    const double v = estimates[2];
    exponentialFactorsFromV(v, lowerKFactor, upperKFactor);
    if (!std::isnan(lowerKFactor)) {
        auxiliary[0] = x1;
        auxiliary[1] = x2;
    }
}

void ExponentialModelTI::calcToleranceInterval() {
    const int type = confidenceType;
    if (type <= 0) {
        lowerLimit = std::isnan(lowerKFactor) ? kNaN : lowerKFactor * location;
        if (type < 0) {
            upperLimit = lowerLimit;
            return;
        }
    }
    if (type >= 0) {
        upperLimit = std::isnan(upperKFactor) ? kNaN : upperKFactor * location;
        if (type > 0) lowerLimit = upperLimit;
    }
}

}  // namespace kelstat
