// Newton-Raphson optimisation of a smooth objective of several parameters.
#ifndef KELSTAT_NUMERICS_NEWTON_RAPHSON_H
#define KELSTAT_NUMERICS_NEWTON_RAPHSON_H

#include <vector>

#include "matrix/matrix_new.h"

namespace kelstat {

// An objective for NewtonRaphson: its value, first derivatives, negative second derivatives and
// starting estimates, plus optional hooks. Derived classes add their own destructor; the base is
// never deleted through a pointer to it.
class FunctionFirstNegSecondDerivative {
  public:
    using SymmetricMatrix = vek::matrix_library::Smatrix<double>;

    // Value at theta. Sets *valid false when theta is outside the domain, and may set
    // *parameterIndex to a parameter sitting at its fixed point. The last argument is always -1.
    virtual double calculateFunction(const std::vector<double>& theta, bool* valid,
                                     int* parameterIndex, int) const = 0;
    // Called before each derivative evaluation, to prepare terms the derivatives share.
    virtual void intermediateCalculations(const std::vector<double>& theta);
    virtual void calculateFirstDerivative(const std::vector<double>& theta,
                                          std::vector<double>& gradient, bool* valid) const = 0;
    virtual void calculateNegSecondDerivative(const std::vector<double>& theta,
                                              const std::vector<double>& gradient,
                                              SymmetricMatrix& negHessian, bool* valid) const = 0;
    virtual void calculateStartingEstimates(std::vector<double>& theta) const = 0;
    // The value of each parameter at which the objective is irregular; NaN for none (the default).
    virtual void setFixedPoint(int n, std::vector<double>& fixedPoint);
    virtual void setUpIterationHistoryTable();
    virtual void displayIterationHistoryRow(int iteration, double value);
    virtual bool checkValidParameters(const std::vector<double>& theta) const;
    virtual void calculateBiasCorrection(const std::vector<int>& fixed,
                                         std::vector<double>& theta) const;

  protected:
    FunctionFirstNegSecondDerivative() = default;
    FunctionFirstNegSecondDerivative(const FunctionFirstNegSecondDerivative&) = default;
    FunctionFirstNegSecondDerivative& operator=(const FunctionFirstNegSecondDerivative&) = default;
    ~FunctionFirstNegSecondDerivative() = default;
};

// Finds the optimum of an objective by Newton steps solved from the Cholesky factor of the
// negative second-derivative matrix. Steps that worsen the objective or leave its domain are
// halved; a matrix that is not positive definite gets a ridge on its failing diagonal elements;
// a parameter reaching its fixed point (when irregular-function checking is on) is held there
// while the others are optimised. The covariance returned is the inverse negative Hessian at the
// optimum.
//
// Outcomes are reported through codes, never thrown:
//   result code 0 converged, 1 not yet run, 2/3/4 iterations exhausted with only the estimates /
//   only the function value / neither converged (5/6/7 when the last step needed a ridge),
//   8 diverging, 9 invalid objective value, 10 invalid first or 11 invalid second derivatives;
//   matrix code 0 full inverse, 1 inverse with parameters eliminated (zero rows and columns),
//   2 no inverse.
// The objective is borrowed and must outlive the object. One run per object is the intended use;
// the ridge factors it adapts carry over to a later run.
class NewtonRaphson {
  public:
    using SymmetricMatrix = vek::matrix_library::Smatrix<double>;
    using TriangularMatrix = vek::matrix_library::UTmatrix<double>;

    // objective must not be null; its fixed points are read here. The step always solves
    // negHessian * step = gradient; maximise only decides which value changes are improvements.
    NewtonRaphson(FunctionFirstNegSecondDerivative* objective, int n, bool maximise);

    // Runs the optimisation from the objective's starting estimates. theta receives the estimates
    // (n of them, also on failure), covariance the inverse negative Hessian of order n. After
    // codes 9 to 11 no covariance is formed: it stays zero and the matrix code is 2. True exactly
    // when the result code is 0.
    bool mCalculateOptimal(std::vector<double>& theta, SymmetricMatrix& covariance);

    void mSetMaximumNumberOfIterations(int iterations) { mMaximumIterations = iterations; }
    void mSetToleranceFunction(double tolerance) { mFunctionTolerance = tolerance; }
    void mSetToleranceMaxArguments(double tolerance) { mEstimateTolerance = tolerance; }
    // Below this magnitude the convergence tolerances are absolute rather than relative.
    void mSetSmallValue(double value) { mSmallValue = value; }
    void mSetDisplayIterationHistory() { mDisplayIterationHistory = true; }
    void mCheckIrregularFunction(bool check) { mIrregularFunction = check; }

    int mGetResultCode() const { return mResultCode; }
    int mGetMatrixCode() const { return mMatrixCode; }
    int mGetEliminatedArgumentNumber() const { return mEliminatedArgument; }
    int mGetMaximumNumberOfIterations() const { return mMaximumIterations; }
    double mGetFunction() const { return mFunctionValue; }
    // The ridge factors as adapted so far: the first is halved whenever the first ridge attempt
    // gives an acceptable step, until it is no longer above 1e-4.
    const std::vector<double>& mGetRidgeFactors() const { return mRidgeFactors; }

  protected:
    // The steps of a run, open to derived classes that refine a step.
    void mPerformNewtonAlgorithm(bool fixedMode, const std::vector<int>& fixed,
                                 std::vector<double>& theta, std::vector<double>& history);
    void mCheckFunctionConvergence(double reference);
    void mCheckEstimatesConvergence(const std::vector<double>& theta,
                                    const std::vector<double>& reference);
    void mCheckAlgorithmConverged(const std::vector<double>& theta, double referenceValue,
                                  const std::vector<double>& referenceEstimates);
    // Counts worsenings from `reference` by more than 100 times its magnitude (1 below the small
    // value); one by more than 10000 times reaches the limit of 4 at once.
    void mCheckDiverging(double reference);

    // Produces a step when the factorisation failed at column failIndex; theta is not consulted.
    void mMakeMatrixNonSingular(const std::vector<double>& theta,
                                const std::vector<double>& savedTheta, std::vector<double>& step,
                                const std::vector<int>& fixed, double pivot, int failIndex);
    // Ridge-repairs the failed factor from `column` on; false when the order's worth of restarts
    // could not complete it.
    bool mMakeAdjustment(int column, double pivot, double factor);
    // Repairs a step that worsened the value or left the domain, then, outside fixed mode, moves
    // to the parameter's fixed point when holding it there is at least as good.
    void mCheckCurrentStep(std::vector<double>& theta, double previousValue,
                           const std::vector<double>& savedTheta, std::vector<double>& step,
                           bool fixedMode, int failIndex, int parameterIndex, bool* stepOK,
                           bool* valid);
    // Halves the step until the value is valid and not worse than previousValue; from the eighth
    // check on, a value better than twice previousValue also ends the search.
    void mSearchForBetterStep(std::vector<double>& theta, double previousValue,
                              const std::vector<double>& savedTheta, std::vector<double>& step,
                              bool* valid);
    // Newton step from savedTheta with `parameter` held at its fixed point; false when it has
    // none or the reduced system cannot be solved.
    bool mCalcEstimatesAtFixedPoint(int parameter, const std::vector<double>& savedTheta,
                                    bool* valid, double* value,
                                    std::vector<double>& thetaAtFixedPoint);
    // Covariance at theta and the matrix code; fixed parameters, or a singular column that has a
    // fixed point, get zero rows and columns.
    void mCalculateInverseNegSecondDerivative(bool fixedMode, const std::vector<int>& fixed,
                                              const std::vector<double>& theta,
                                              SymmetricMatrix& covariance);

  private:
    bool isBetter(double candidate, double reference) const;
    bool isWorse(double candidate, double reference) const;
    double evaluate(const std::vector<double>& theta, bool* valid, int* parameterIndex) const;
    // Fills the gradient and negative Hessian at theta; 0, or the result code of the failure.
    int evaluateDerivatives(const std::vector<double>& theta);
    void removeFixedParameters(const std::vector<int>& fixed);
    void stopWith(int resultCode);

    FunctionFirstNegSecondDerivative* mObjective;
    double mFunctionValue = 0.0;
    double mPassStartValue = 0.0;
    int mParameterCount;
    bool mMaximise;
    bool mMatrixAdjusted = false;
    bool mAlgorithmConverged = false;
    bool mFunctionConverged = false;
    bool mEstimatesConverged = false;
    bool mDiverging = false;
    int mDivergenceCount = 0;
    std::vector<double> mFixedPoint;
    bool mIrregularFunction = false;
    std::vector<double> mGradient;
    SymmetricMatrix mNegHessian;
    std::vector<double> mPassStartEstimates;
    TriangularMatrix mFactor;
    TriangularMatrix mWork;
    int mMaximumIterations = 50;
    double mDivergenceJump = 10000.0;
    double mDivergenceStep = 100.0;
    int mDivergenceLimit = 4;
    int mHalvingsBeforeSecondRule = 7;
    int mRidgeAttempts = 3;
    double mRidgeFactorMinimum = 0.0001;
    std::vector<double> mRidgeFactors{0.063, 1.0, 16.0};
    double mFunctionTolerance = 0.0001;
    double mEstimateTolerance = 0.0001;
    double mSmallValue = 0.01;
    int mResultCode = 1;
    int mMatrixCode = 0;
    int mEliminatedArgument = -1;
    bool mDisplayIterationHistory = false;
};

}  // namespace kelstat

#endif  // KELSTAT_NUMERICS_NEWTON_RAPHSON_H
