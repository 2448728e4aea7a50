#include "numerics/newton_raphson.h"

#include <cmath>
#include <cstddef>
#include <limits>

#include "matrix/matrix_functions.h"
#include "numerics/real_function.h"

namespace kelstat {

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// Added to a ridge-repaired diagonal element so that a zero pivot cannot repeat.
constexpr double kRidgeFloor = 1e-12;

// A finite step underflows to zero within about 2100 halvings, which returns the estimates to
// the saved point whose value ends the search; only an infinite or NaN step gets this far, and
// the search then stops with the last halved step in place.
constexpr int kMaxStepHalvings = 2200;

// The driver's result codes.
constexpr int kConverged = 0;
constexpr int kEstimatesOnly = 2;
constexpr int kFunctionOnly = 3;
constexpr int kNeitherConverged = 4;
constexpr int kAdjustedOffset = 3;  // added to 2, 3, 4 when the last step needed a ridge
constexpr int kDiverging = 8;
constexpr int kInvalidFunction = 9;
constexpr int kInvalidFirstDerivative = 10;
constexpr int kInvalidSecondDerivative = 11;
constexpr int kDerivativesValid = 0;  // evaluateDerivatives: no failure code

// Matrix codes of the covariance.
constexpr int kFullInverse = 0;
constexpr int kReducedInverse = 1;
constexpr int kNoInverse = 2;

using vek::matrix_library::CholeskyBackSub;
using vek::matrix_library::CholeskyDecomp;
using vek::matrix_library::CholeskyInverse;
using vek::matrix_library::SmatrixToUTmatrix;

double euclideanNorm(const std::vector<double>& values) {
    double sum = 0.0;
    for (double value : values) sum += value * value;
    return std::sqrt(sum);
}

// Fixed parameters are listed in increasing order; zeros go back in first to last so that each
// index refers to the full vector.
void insertZerosAt(const std::vector<int>& fixed, std::vector<double>& values) {
    for (int index : fixed) values.insert(values.begin() + index, 0.0);
}

void removeEntriesAt(const std::vector<int>& fixed, std::vector<double>& values) {
    for (auto index = fixed.rbegin(); index != fixed.rend(); ++index) {
        values.erase(values.begin() + *index);
    }
}

void removeRowsAndColumnsAt(const std::vector<int>& fixed,
                            vek::matrix_library::Smatrix<double>& matrix) {
    for (auto index = fixed.rbegin(); index != fixed.rend(); ++index) matrix.removeColRow(*index);
}

}  // namespace

// ---- Objective defaults ----------------------------------------------------------------------

void FunctionFirstNegSecondDerivative::intermediateCalculations(const std::vector<double>&) {}

void FunctionFirstNegSecondDerivative::setFixedPoint(int n, std::vector<double>& fixedPoint) {
    fixedPoint.assign(static_cast<std::size_t>(n > 0 ? n : 0), kNaN);
}

void FunctionFirstNegSecondDerivative::setUpIterationHistoryTable() {}

void FunctionFirstNegSecondDerivative::displayIterationHistoryRow(int, double) {}

bool FunctionFirstNegSecondDerivative::checkValidParameters(const std::vector<double>&) const {
    return true;
}

void FunctionFirstNegSecondDerivative::calculateBiasCorrection(const std::vector<int>&,
                                                               std::vector<double>&) const {}

// ---- Driver ----------------------------------------------------------------------------------

NewtonRaphson::NewtonRaphson(FunctionFirstNegSecondDerivative* objective, int n, bool maximise)
    : mObjective(objective),
      mParameterCount(n > 0 ? n : 0),
      mMaximise(maximise),
      mGradient(static_cast<std::size_t>(mParameterCount), 0.0),
      mNegHessian(mParameterCount, 0.0),
      mPassStartEstimates(static_cast<std::size_t>(mParameterCount), 0.0),
      mFactor(mParameterCount, 0.0),
      mWork(mParameterCount, 0.0) {
    mObjective->setFixedPoint(mParameterCount, mFixedPoint);
    // An objective that fills the wrong number of entries must not leave indexes dangling.
    mFixedPoint.resize(static_cast<std::size_t>(mParameterCount), kNaN);
}

bool NewtonRaphson::isBetter(double candidate, double reference) const {
    return mMaximise ? candidate > reference : candidate < reference;
}

bool NewtonRaphson::isWorse(double candidate, double reference) const {
    return mMaximise ? candidate < reference : candidate > reference;
}

double NewtonRaphson::evaluate(const std::vector<double>& theta, bool* valid,
                               int* parameterIndex) const {
    *valid = true;
    *parameterIndex = -1;
    return mObjective->calculateFunction(theta, valid, parameterIndex, -1);
}

void NewtonRaphson::stopWith(int resultCode) {
    mResultCode = resultCode;
    if (resultCode >= kInvalidFunction) mMatrixCode = kNoInverse;
}

bool NewtonRaphson::mCalculateOptimal(std::vector<double>& theta, SymmetricMatrix& covariance) {
    theta.resize(static_cast<std::size_t>(mParameterCount));
    covariance.resize(mParameterCount, 0.0);
    mDivergenceCount = 0;
    mEliminatedArgument = -1;
    if (mDisplayIterationHistory) mObjective->setUpIterationHistoryTable();

    std::vector<double> history;
    std::vector<int> fixed;
    mPerformNewtonAlgorithm(false, fixed, theta, history);

    // A parameter that ended exactly on its fixed point is irregular there: optimise the others
    // with every parameter that has a fixed point held.
    bool fixedMode = false;
    if (mIrregularFunction) {
        for (int i = 0; i < mParameterCount; ++i) {
            if (theta[i] == mFixedPoint[i]) fixedMode = true;
        }
    }
    if (fixedMode) {
        for (int i = 0; i < mParameterCount; ++i) {
            if (!std::isnan(mFixedPoint[i])) fixed.push_back(i);
        }
        mPerformNewtonAlgorithm(true, fixed, theta, history);
    }

    if (mDisplayIterationHistory) {
        for (std::size_t k = 0; k < history.size(); ++k) {
            mObjective->displayIterationHistoryRow(static_cast<int>(k), history[k]);
        }
    }

    // Without iterations there is no last step to judge; a stop keeps its own code.
    const bool stoppedEarly = mResultCode >= kDiverging;
    if (!stoppedEarly && mMaximumIterations > 0 && !(mFunctionConverged && mEstimatesConverged)) {
        int code = kNeitherConverged;
        if (mEstimatesConverged) code = kEstimatesOnly;
        if (mFunctionConverged) code = kFunctionOnly;
        mResultCode = mMatrixAdjusted ? code + kAdjustedOffset : code;
    }

    // Invalid values or derivatives leave no point at which a covariance means anything.
    const bool invalidStop = mResultCode >= kInvalidFunction;
    if (!invalidStop && mObjective->checkValidParameters(theta)) {
        mObjective->intermediateCalculations(theta);
        mCalculateInverseNegSecondDerivative(fixedMode, fixed, theta, covariance);
    }
    return mResultCode == kConverged;
}

int NewtonRaphson::evaluateDerivatives(const std::vector<double>& theta) {
    const auto n = static_cast<std::size_t>(mParameterCount);
    bool valid = true;
    mGradient.assign(n, 0.0);
    mObjective->calculateFirstDerivative(theta, mGradient, &valid);
    // Derivatives of the wrong size are as unusable as ones the objective calls invalid.
    if (!valid || mGradient.size() != n) return kInvalidFirstDerivative;
    mNegHessian.resize(mParameterCount, 0.0);
    mObjective->calculateNegSecondDerivative(theta, mGradient, mNegHessian, &valid);
    if (!valid || mNegHessian.rowCount() != mParameterCount) return kInvalidSecondDerivative;
    return kDerivativesValid;
}

void NewtonRaphson::removeFixedParameters(const std::vector<int>& fixed) {
    removeEntriesAt(fixed, mGradient);
    removeRowsAndColumnsAt(fixed, mNegHessian);
}

void NewtonRaphson::mPerformNewtonAlgorithm(bool fixedMode, const std::vector<int>& fixed,
                                            std::vector<double>& theta,
                                            std::vector<double>& history) {
    const auto n = static_cast<std::size_t>(mParameterCount);
    mResultCode = kConverged;
    mMatrixCode = kFullInverse;
    mAlgorithmConverged = mFunctionConverged = mEstimatesConverged = mDiverging = false;
    std::vector<double> step(n, 0.0);
    std::vector<double> savedTheta(n, 0.0);

    int passes = 1;
    if (fixedMode) {
        mObjective->calculateBiasCorrection(fixed, theta);
        passes = mMaximumIterations;
    } else {
        mObjective->calculateStartingEstimates(theta);
    }
    theta.resize(n);

    bool valid = true;
    int parameterIndex = -1;
    mFunctionValue = evaluate(theta, &valid, &parameterIndex);
    history.push_back(mFunctionValue);
    if (!valid) return stopWith(kInvalidFunction);

    for (int pass = 0; pass < passes; ++pass) {
        mPassStartValue = mFunctionValue;
        mPassStartEstimates = theta;

        for (int iteration = 0; iteration < mMaximumIterations; ++iteration) {
            mMatrixAdjusted = false;
            mObjective->intermediateCalculations(theta);
            if (const int failure = evaluateDerivatives(theta); failure != kDerivativesValid) {
                return stopWith(failure);
            }
            if (fixedMode) removeFixedParameters(fixed);

            mWork = SmatrixToUTmatrix(mNegHessian);
            int failIndex = -1;
            double pivot = 0.0;
            mFactor = CholeskyDecomp(mWork, 0, &failIndex, &pivot);
            if (failIndex == -1) {
                step = CholeskyBackSub(mFactor, mGradient);
                if (fixedMode) insertZerosAt(fixed, step);
            } else {
                // Returns a step over all n parameters, zeros at the fixed ones included.
                mMakeMatrixNonSingular(theta, savedTheta, step,
                                       fixedMode ? fixed : std::vector<int>{}, pivot, failIndex);
            }

            savedTheta = theta;
            for (std::size_t i = 0; i < n; ++i) theta[i] += step[i];
            const double previousValue = mFunctionValue;
            mFunctionValue = evaluate(theta, &valid, &parameterIndex);

            bool stepOK = true;
            mCheckCurrentStep(theta, previousValue, savedTheta, step, fixedMode, failIndex,
                              parameterIndex, &stepOK, &valid);
            if (!fixedMode) history.push_back(mFunctionValue);
            if (!valid) return stopWith(kInvalidFunction);

            // A repaired matrix gives a step that says nothing about convergence.
            if (stepOK && !mMatrixAdjusted) {
                mCheckAlgorithmConverged(theta, previousValue, savedTheta);
            }
            if (mAlgorithmConverged) break;
            mCheckDiverging(previousValue);
            if (mDiverging) return stopWith(kDiverging);
        }

        if (!fixedMode) return;

        // Held parameters move only through the objective's correction between passes; the
        // passes end when a whole pass no longer changes value or estimates.
        mObjective->calculateBiasCorrection(fixed, theta);
        mAlgorithmConverged = mFunctionConverged = mEstimatesConverged = false;
        mFunctionValue = evaluate(theta, &valid, &parameterIndex);
        if (!valid) return stopWith(kInvalidFunction);
        history.push_back(mFunctionValue);
        mCheckAlgorithmConverged(theta, mPassStartValue, mPassStartEstimates);
        if (mAlgorithmConverged) return;
    }
}

void NewtonRaphson::mCheckFunctionConvergence(double reference) {
    const double scale = std::fmax(std::fabs(reference), mSmallValue);
    mFunctionConverged = std::fabs(mFunctionValue - reference) < mFunctionTolerance * scale;
}

void NewtonRaphson::mCheckEstimatesConvergence(const std::vector<double>& theta,
                                               const std::vector<double>& reference) {
    mEstimatesConverged = true;
    for (std::size_t i = 0; i < theta.size() && i < reference.size(); ++i) {
        const double scale = std::fmax(std::fabs(reference[i]), mSmallValue);
        if (!(std::fabs(theta[i] - reference[i]) <= mEstimateTolerance * scale)) {
            mEstimatesConverged = false;
            return;
        }
    }
}

void NewtonRaphson::mCheckAlgorithmConverged(const std::vector<double>& theta,
                                             double referenceValue,
                                             const std::vector<double>& referenceEstimates) {
    mCheckFunctionConvergence(referenceValue);
    mCheckEstimatesConvergence(theta, referenceEstimates);
    if (mFunctionConverged && mEstimatesConverged) mAlgorithmConverged = true;
}

void NewtonRaphson::mCheckDiverging(double reference) {
    if (std::isnan(reference) || isBetter(mFunctionValue, reference) ||
        equalWithinFuzz(mFunctionValue, reference, 0.0)) {
        return;
    }
    const double worsening = std::fabs(mFunctionValue - reference);
    const double magnitude = std::fabs(reference) >= mSmallValue ? std::fabs(reference) : 1.0;
    if (worsening > mDivergenceJump * magnitude) {
        mDivergenceCount = mDivergenceLimit;
    } else if (worsening > mDivergenceStep * magnitude) {
        ++mDivergenceCount;
    }
    mDiverging = mDivergenceCount >= mDivergenceLimit;
}

// ---- Safeguards ------------------------------------------------------------------------------

bool NewtonRaphson::mMakeAdjustment(int column, double pivot, double factor) {
    // mFactor holds the partial factor of the failed factorisation: columns before `column`
    // done, later ones still the negative Hessian's upper triangle.
    const int order = mNegHessian.rowCount();
    TriangularMatrix partial = mFactor;
    for (int restart = 0; restart < order && column != -1; ++restart) {
        TriangularMatrix ridged = partial;
        const double diagonal = mNegHessian(column, column);
        ridged(column, column) = diagonal + std::fabs(diagonal) * factor + pivot + kRidgeFloor;
        partial = CholeskyDecomp(ridged, column, &column, &pivot);
    }
    mFactor = partial;
    return column == -1;
}

void NewtonRaphson::mMakeMatrixNonSingular(const std::vector<double>&,
                                           const std::vector<double>& savedTheta,
                                           std::vector<double>& step, const std::vector<int>& fixed,
                                           double pivot, int failIndex) {
    mMatrixAdjusted = true;
    const TriangularMatrix failedFactor = mFactor;
    const double parameterCount = mParameterCount;
    const double savedNorm = euclideanNorm(savedTheta);
    for (int attempt = 0; attempt < mRidgeAttempts; ++attempt) {
        mFactor = failedFactor;
        // A factor that no ridge could complete yields no usable step: stand still instead.
        if (!mMakeAdjustment(failIndex, pivot, mRidgeFactors[attempt])) {
            step.assign(static_cast<std::size_t>(mParameterCount), 0.0);
            continue;
        }
        step = CholeskyBackSub(mFactor, mGradient);
        insertZerosAt(fixed, step);

        // The step must be modest next to the estimates themselves (or, near 0, in absolute
        // size): no more than n times their norm.
        const double stepNorm = euclideanNorm(step);
        const double size =
            savedNorm < mSmallValue ? std::fabs(savedNorm - stepNorm) : stepNorm / savedNorm;
        if (parameterCount > size) {
            if (attempt == 0 && mRidgeFactors[0] > mRidgeFactorMinimum) mRidgeFactors[0] *= 0.5;
            return;
        }
    }
}

void NewtonRaphson::mCheckCurrentStep(std::vector<double>& theta, double previousValue,
                                      const std::vector<double>& savedTheta,
                                      std::vector<double>& step, bool fixedMode, int failIndex,
                                      int parameterIndex, bool* stepOK, bool* valid) {
    *stepOK = true;
    const bool worse = !std::isnan(previousValue) && isWorse(mFunctionValue, previousValue) &&
                       !equalWithinFuzz(mFunctionValue, previousValue, 0.0);
    if (!*valid || worse) {
        *stepOK = false;
        mSearchForBetterStep(theta, previousValue, savedTheta, step, valid);
        mFunctionConverged = mEstimatesConverged = false;
    }
    if (fixedMode) return;

    // The step may have run into a parameter's irregular point: compare with the best point
    // that holds that parameter there.
    const int parameter = parameterIndex != -1 ? parameterIndex : failIndex;
    bool validAtFixedPoint = false;
    double valueAtFixedPoint = kNaN;
    std::vector<double> thetaAtFixedPoint;
    if (!mCalcEstimatesAtFixedPoint(parameter, savedTheta, &validAtFixedPoint, &valueAtFixedPoint,
                                    thetaAtFixedPoint) ||
        !validAtFixedPoint) {
        return;
    }
    if (!std::isnan(mFunctionValue) && isBetter(mFunctionValue, valueAtFixedPoint) &&
        !equalWithinFuzz(mFunctionValue, valueAtFixedPoint, 0.0)) {
        return;
    }

    *valid = true;
    mFunctionValue = valueAtFixedPoint;
    theta = thetaAtFixedPoint;
    if (!std::isnan(previousValue) && isWorse(valueAtFixedPoint, previousValue) &&
        !equalWithinFuzz(valueAtFixedPoint, previousValue, 0.0)) {
        return;
    }
    *stepOK = true;
    mMatrixAdjusted = false;
}

void NewtonRaphson::mSearchForBetterStep(std::vector<double>& theta, double previousValue,
                                         const std::vector<double>& savedTheta,
                                         std::vector<double>& step, bool* valid) {
    // After a few halvings, settle for anything better than twice the previous value.
    const double target = 2.0 * previousValue;
    for (int count = 0; count < kMaxStepHalvings; ++count) {
        if (count >= mHalvingsBeforeSecondRule && *valid &&
            (std::isnan(target) || isBetter(mFunctionValue, target) ||
             equalWithinFuzz(mFunctionValue, target, 0.0))) {
            return;
        }
        for (std::size_t i = 0; i < step.size() && i < theta.size(); ++i) {
            step[i] *= 0.5;
            theta[i] = savedTheta[i] + step[i];
        }
        int parameterIndex = -1;
        mFunctionValue = evaluate(theta, valid, &parameterIndex);
        if (*valid && (std::isnan(previousValue) || isBetter(mFunctionValue, previousValue) ||
                       equalWithinFuzz(mFunctionValue, previousValue, 0.0))) {
            return;
        }
    }
}

bool NewtonRaphson::mCalcEstimatesAtFixedPoint(int parameter, const std::vector<double>& savedTheta,
                                               bool* valid, double* value,
                                               std::vector<double>& thetaAtFixedPoint) {
    *value = kNaN;
    if (parameter < 0 || parameter >= mParameterCount || std::isnan(mFixedPoint[parameter])) {
        return false;
    }
    thetaAtFixedPoint.resize(static_cast<std::size_t>(mParameterCount));

    SymmetricMatrix negHessian(mParameterCount, 0.0);
    bool derivativesValid = true;
    mObjective->calculateNegSecondDerivative(savedTheta, mGradient, negHessian, &derivativesValid);
    if (!derivativesValid || negHessian.rowCount() != mParameterCount) return false;

    const std::vector<int> held{parameter};
    std::vector<double> gradient = mGradient;
    removeEntriesAt(held, gradient);
    removeRowsAndColumnsAt(held, negHessian);
    int failIndex = -1;
    double pivot = 0.0;
    const TriangularMatrix factor =
        CholeskyDecomp(SmatrixToUTmatrix(negHessian), 0, &failIndex, &pivot);
    if (failIndex != -1) return false;

    std::vector<double> step = CholeskyBackSub(factor, gradient);
    insertZerosAt(held, step);
    for (int i = 0; i < mParameterCount; ++i) thetaAtFixedPoint[i] = savedTheta[i] + step[i];
    thetaAtFixedPoint[parameter] = mFixedPoint[parameter];

    int parameterIndex = -1;
    *value = evaluate(thetaAtFixedPoint, valid, &parameterIndex);
    return true;
}

void NewtonRaphson::mCalculateInverseNegSecondDerivative(bool fixedMode,
                                                         const std::vector<int>& fixed,
                                                         const std::vector<double>& theta,
                                                         SymmetricMatrix& covariance) {
    if (evaluateDerivatives(theta) != kDerivativesValid) {
        mMatrixCode = kNoInverse;
        return;
    }
    const SymmetricMatrix noInverse(mParameterCount, kNaN);
    int failIndex = -1;
    double pivot = 0.0;

    if (fixedMode) {
        removeFixedParameters(fixed);
        mFactor = CholeskyDecomp(SmatrixToUTmatrix(mNegHessian), 0, &failIndex, &pivot);
        if (failIndex != -1) {
            covariance = noInverse;
            mMatrixCode = kNoInverse;
            return;
        }
        covariance = CholeskyInverse(mFactor);
        for (int index : fixed) covariance.insertColRow(index, 0.0);
        mMatrixCode = kReducedInverse;
        mEliminatedArgument = fixed.empty() ? -1 : fixed.front();
        return;
    }

    mFactor = CholeskyDecomp(SmatrixToUTmatrix(mNegHessian), 0, &failIndex, &pivot);
    if (failIndex == -1) {
        covariance = CholeskyInverse(mFactor);
        mMatrixCode = kFullInverse;
        return;
    }
    // Singular at a parameter with an irregular point: the others still have a covariance.
    if (!std::isnan(mFixedPoint[failIndex])) {
        SymmetricMatrix reduced = mNegHessian;
        reduced.removeColRow(failIndex);
        SymmetricMatrix reducedInverse;
        if (vek::matrix_library::inverse(reduced, &reducedInverse)) {
            reducedInverse.insertColRow(failIndex, 0.0);
            covariance = reducedInverse;
            mMatrixCode = kReducedInverse;
            mEliminatedArgument = failIndex;
            return;
        }
    }
    covariance = noInverse;
    mMatrixCode = kNoInverse;
}

}  // namespace kelstat
