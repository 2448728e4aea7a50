#include "tolerance/exponential_model.h"

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
    if (!inDomain || !(v > 0.0)) return false;
    const double residuals[] = {
        mH(x1, x2),
        (std::pow(v, x1) - std::pow(1.0 - v, x1)) - mProportion,
        (std::pow(v, x2) - std::pow(1.0 - v, x2)) - mProportion,
    };
    for (double residual : residuals) {
        if (!(std::fabs(residual) <= kSolutionTolerance)) return false;
    }
    return true;
}

namespace {

// Residuals of the three equations at theta; g without its domain gate.
struct Residuals {
    double values[3];
    double largest() const {
        double worst = 0.0;
        for (double value : values) {
            if (!(std::fabs(value) <= worst)) worst = std::fabs(value);  // NaN sticks
        }
        return worst;
    }
};

double determinant3(const double m[3][3]) {
    return m[0][0] * (m[1][1] * m[2][2] - m[1][2] * m[2][1]) -
           m[0][1] * (m[1][0] * m[2][2] - m[1][2] * m[2][0]) +
           m[0][2] * (m[1][0] * m[2][1] - m[1][1] * m[2][0]);
}

// Newton on the equations converges quadratically from where the maximiser leaves off; a few
// dozen steps are plenty, and the cap bounds a start far from any solution.
constexpr int kMaxRefinementSteps = 100;
// A step is halved at most this often before the refinement gives up at the current point.
constexpr int kMaxRefinementHalvings = 60;

}  // namespace

bool ExponentialTSKFactorHelper::refineSolution(std::vector<double>& theta) const {
    if (theta.size() != static_cast<std::size_t>(kParameterCount)) return false;
    const auto residualsAt = [this](const std::vector<double>& point) {
        const double v = point[2];
        return Residuals{{mH(point[0], point[1]),
                          (std::pow(v, point[0]) - std::pow(1.0 - v, point[0])) - mProportion,
                          (std::pow(v, point[1]) - std::pow(1.0 - v, point[1])) - mProportion}};
    };
    Residuals residuals = residualsAt(theta);
    for (int step = 0; step < kMaxRefinementSteps && residuals.largest() > 0.0; ++step) {
        std::vector<double> dH;
        std::vector<double> dG1;
        std::vector<double> dG2;
        mHDerivatives(theta[0], theta[1], dH);
        mGDerivatives(theta[0], theta[2], dG1);
        mGDerivatives(theta[1], theta[2], dG2);
        const double jacobian[3][3] = {
            {dH[0], dH[1], 0.0}, {dG1[0], 0.0, dG1[1]}, {0.0, dG2[0], dG2[1]}};
        const double det = determinant3(jacobian);
        if (!std::isfinite(det) || det == 0.0) break;
        // Cramer's rule for J delta = -r, one column replaced at a time.
        double delta[3];
        for (int column = 0; column < 3; ++column) {
            double replaced[3][3];
            for (int row = 0; row < 3; ++row) {
                for (int col = 0; col < 3; ++col) {
                    replaced[row][col] =
                        col == column ? -residuals.values[row] : jacobian[row][col];
                }
            }
            delta[column] = determinant3(replaced) / det;
        }
        bool improved = false;
        std::vector<double> trial(theta);
        for (int halving = 0; halving <= kMaxRefinementHalvings && !improved; ++halving) {
            for (int i = 0; i < 3; ++i) trial[i] = theta[i] + delta[i];
            const Residuals trialResiduals = residualsAt(trial);
            if (trialResiduals.largest() < residuals.largest()) {
                theta = trial;
                residuals = trialResiduals;
                improved = true;
            }
            for (double& component : delta) component *= 0.5;
        }
        if (!improved) break;
    }
    return solvesEquations(theta);
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
