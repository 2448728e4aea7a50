#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>
#include <utility>
#include <vector>

#include "numerics/newton_raphson.h"

namespace kelstat {
namespace {

using Vector = std::vector<double>;
using SymmetricMatrix = vek::matrix_library::Smatrix<double>;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// An objective assembled from plain functions, so that each test states only its mathematics.
// `valid` decides the domain; `atFixedPoint` may name a parameter that has stepped onto (or past)
// its irregular point.
class TestObjective : public FunctionFirstNegSecondDerivative {
  public:
    std::function<double(const Vector&)> value;
    std::function<Vector(const Vector&)> gradient;
    std::function<std::vector<Vector>(const Vector&)> negHessian;  // full rows
    std::function<bool(const Vector&)> valid = [](const Vector&) { return true; };
    std::function<int(const Vector&)> atFixedPoint = [](const Vector&) { return -1; };
    Vector start;
    Vector fixedPoints;  // empty: none
    mutable int evaluations = 0;
    mutable int invalidEvaluations = 0;
    mutable int biasCorrections = 0;
    std::vector<std::pair<int, double>> historyRows;
    bool historyTableSetUp = false;

    double calculateFunction(const Vector& theta, bool* isValid, int* parameterIndex,
                             int) const override {
        ++evaluations;
        *parameterIndex = atFixedPoint(theta);
        *isValid = valid(theta);
        if (!*isValid) {
            ++invalidEvaluations;
            return kNaN;
        }
        return value(theta);
    }
    void calculateFirstDerivative(const Vector& theta, Vector& result,
                                  bool* isValid) const override {
        *isValid = valid(theta);
        if (*isValid) result = gradient(theta);
    }
    void calculateNegSecondDerivative(const Vector& theta, const Vector&, SymmetricMatrix& result,
                                      bool* isValid) const override {
        *isValid = valid(theta);
        if (!*isValid) return;
        const std::vector<Vector> rows = negHessian(theta);
        for (int i = 0; i < static_cast<int>(rows.size()); ++i) {
            for (int j = 0; j <= i; ++j) result(i, j) = rows[i][j];
        }
    }
    void calculateStartingEstimates(Vector& theta) const override { theta = start; }
    void setFixedPoint(int n, Vector& fixedPoint) override {
        if (fixedPoints.empty()) {
            FunctionFirstNegSecondDerivative::setFixedPoint(n, fixedPoint);
        } else {
            fixedPoint = fixedPoints;
        }
    }
    void calculateBiasCorrection(const std::vector<int>&, Vector&) const override {
        ++biasCorrections;
    }
    void setUpIterationHistoryTable() override { historyTableSetUp = true; }
    void displayIterationHistoryRow(int iteration, double rowValue) override {
        historyRows.emplace_back(iteration, rowValue);
    }
};

struct Outcome {
    bool converged;
    Vector theta;
    SymmetricMatrix covariance;
    int resultCode;
    int matrixCode;
    int eliminated;
};

Outcome optimise(NewtonRaphson& solver) {
    Outcome outcome{};
    outcome.converged = solver.mCalculateOptimal(outcome.theta, outcome.covariance);
    outcome.resultCode = solver.mGetResultCode();
    outcome.matrixCode = solver.mGetMatrixCode();
    outcome.eliminated = solver.mGetEliminatedArgumentNumber();
    return outcome;
}

// -(t - 3)^2, maximised from 0: one exact step, then a step that changes nothing.
TestObjective concaveQuadratic() {
    TestObjective f;
    f.value = [](const Vector& t) { return -(t[0] - 3.0) * (t[0] - 3.0); };
    f.gradient = [](const Vector& t) { return Vector{-2.0 * (t[0] - 3.0)}; };
    f.negHessian = [](const Vector&) { return std::vector<Vector>{{2.0}}; };
    f.start = {0.0};
    return f;
}

TEST(NewtonRaphson, ConcaveQuadraticInOneStep) {
    TestObjective f = concaveQuadratic();
    NewtonRaphson solver(&f, 1, true);
    EXPECT_EQ(solver.mGetResultCode(), 1);  // not yet run
    EXPECT_EQ(solver.mGetMaximumNumberOfIterations(), 50);
    const Outcome out = optimise(solver);
    EXPECT_TRUE(out.converged);
    EXPECT_EQ(out.resultCode, 0);
    EXPECT_EQ(out.matrixCode, 0);
    EXPECT_EQ(out.theta, Vector{3.0});
    EXPECT_DOUBLE_EQ(out.covariance(0, 0), 0.5);
    EXPECT_EQ(solver.mGetFunction(), 0.0);
    EXPECT_EQ(f.evaluations, 3);  // start, the exact step, the step that changes nothing
}

TEST(NewtonRaphson, ZeroIterationsReturnsStartWithCovariance) {
    TestObjective f = concaveQuadratic();
    f.start = {1.0};
    NewtonRaphson solver(&f, 1, true);
    solver.mSetMaximumNumberOfIterations(0);
    const Outcome out = optimise(solver);
    EXPECT_TRUE(out.converged);
    EXPECT_EQ(out.resultCode, 0);
    EXPECT_EQ(out.theta, Vector{1.0});
    EXPECT_DOUBLE_EQ(out.covariance(0, 0), 0.5);
    EXPECT_EQ(solver.mGetFunction(), -4.0);
}

TEST(NewtonRaphson, MinimisesWhenTold) {
    // Minimising (t - 3)^2 + 1: the objective supplies the descent direction's system.
    TestObjective f;
    f.value = [](const Vector& t) { return (t[0] - 3.0) * (t[0] - 3.0) + 1.0; };
    f.gradient = [](const Vector& t) { return Vector{-2.0 * (t[0] - 3.0)}; };
    f.negHessian = [](const Vector&) { return std::vector<Vector>{{2.0}}; };
    f.start = {-7.0};
    NewtonRaphson solver(&f, 1, false);
    const Outcome out = optimise(solver);
    EXPECT_EQ(out.resultCode, 0);
    EXPECT_EQ(out.theta, Vector{3.0});
    EXPECT_EQ(solver.mGetFunction(), 1.0);
}

TEST(NewtonRaphson, InvalidStartGivesCode9) {
    TestObjective f = concaveQuadratic();
    f.valid = [](const Vector& t) { return t[0] > 0.0; };
    NewtonRaphson solver(&f, 1, true);
    const Outcome out = optimise(solver);
    EXPECT_FALSE(out.converged);
    EXPECT_EQ(out.resultCode, 9);
    EXPECT_EQ(out.matrixCode, 2);
    EXPECT_EQ(f.evaluations, 1);
}

// Derivatives that the objective rejects stop the run with codes 10 and 11.
class RejectingObjective : public FunctionFirstNegSecondDerivative {
  public:
    bool firstValid = true;
    double calculateFunction(const Vector& t, bool* valid, int*, int) const override {
        *valid = true;
        return -t[0] * t[0];
    }
    void calculateFirstDerivative(const Vector& t, Vector& g, bool* valid) const override {
        g = {-2.0 * t[0]};
        *valid = firstValid;
    }
    void calculateNegSecondDerivative(const Vector&, const Vector&, SymmetricMatrix& h,
                                      bool* valid) const override {
        h(0, 0) = 2.0;
        *valid = false;
    }
    void calculateStartingEstimates(Vector& t) const override { t = {1.0}; }
};

TEST(NewtonRaphson, InvalidDerivativesGiveCodes10And11) {
    RejectingObjective f;
    f.firstValid = false;
    NewtonRaphson first(&f, 1, true);
    Outcome out = optimise(first);
    EXPECT_EQ(out.resultCode, 10);
    EXPECT_EQ(out.matrixCode, 2);
    EXPECT_EQ(out.covariance(0, 0), 0.0);  // untouched

    f.firstValid = true;
    NewtonRaphson second(&f, 1, true);
    out = optimise(second);
    EXPECT_FALSE(out.converged);
    EXPECT_EQ(out.resultCode, 11);
    EXPECT_EQ(out.matrixCode, 2);
}

// log t - t has its maximum at 1 and no values at t <= 0. From 3 the first Newton step lands at
// -3, so the step must be halved back into the domain.
TEST(NewtonRaphson, InvalidRegionForcesHalving) {
    TestObjective f;
    f.value = [](const Vector& t) { return std::log(t[0]) - t[0]; };
    f.gradient = [](const Vector& t) { return Vector{1.0 / t[0] - 1.0}; };
    f.negHessian = [](const Vector& t) { return std::vector<Vector>{{1.0 / (t[0] * t[0])}}; };
    f.valid = [](const Vector& t) { return t[0] > 0.0; };
    f.start = {3.0};
    NewtonRaphson solver(&f, 1, true);
    solver.mSetToleranceFunction(1e-10);
    solver.mSetToleranceMaxArguments(1e-10);
    const Outcome out = optimise(solver);
    EXPECT_EQ(out.resultCode, 0);
    EXPECT_NEAR(out.theta[0], 1.0, 1e-9);
    EXPECT_NEAR(out.covariance(0, 0), 1.0, 1e-8);
    EXPECT_EQ(f.invalidEvaluations, 2);  // -3, then 0; the third halving reaches 1.5
}

// -sqrt(1 + t^2) is concave, but from |t| > 1 the plain Newton iteration t -> -t^3 runs away.
// Halving the worsening step (-8 from 2, then -3, then -0.5) brings it back into the basin.
TEST(NewtonRaphson, WorseningStepIsHalved) {
    TestObjective f;
    f.value = [](const Vector& t) { return -std::sqrt(1.0 + t[0] * t[0]); };
    f.gradient = [](const Vector& t) { return Vector{-t[0] / std::sqrt(1.0 + t[0] * t[0])}; };
    f.negHessian = [](const Vector& t) {
        return std::vector<Vector>{{std::pow(1.0 + t[0] * t[0], -1.5)}};
    };
    f.start = {2.0};
    NewtonRaphson solver(&f, 1, true);
    const Outcome out = optimise(solver);
    EXPECT_EQ(out.resultCode, 0);
    EXPECT_NEAR(out.theta[0], 0.0, 1e-9);
    EXPECT_NEAR(solver.mGetFunction(), -1.0, 1e-15);
    EXPECT_DOUBLE_EQ(out.covariance(0, 0), 1.0);
}

// -t^4 + t^2 is convex near 0, so the negative Hessian at 0.01 is negative and needs a ridge;
// the first attempt's step is small enough to keep, so the first ridge factor is halved.
TEST(NewtonRaphson, RidgeRepairOfIndefiniteMatrix) {
    TestObjective f;
    f.value = [](const Vector& t) { return -std::pow(t[0], 4) + t[0] * t[0]; };
    f.gradient = [](const Vector& t) { return Vector{-4.0 * std::pow(t[0], 3) + 2.0 * t[0]}; };
    f.negHessian = [](const Vector& t) { return std::vector<Vector>{{12.0 * t[0] * t[0] - 2.0}}; };
    f.start = {0.01};
    NewtonRaphson solver(&f, 1, true);
    solver.mSetToleranceMaxArguments(1e-10);
    solver.mSetToleranceFunction(1e-12);
    const Outcome out = optimise(solver);
    EXPECT_EQ(out.resultCode, 0);
    EXPECT_NEAR(out.theta[0], std::sqrt(0.5), 1e-9);
    EXPECT_NEAR(out.covariance(0, 0), 0.25, 1e-8);  // 1 / (12 t^2 - 2) at the maximum
    EXPECT_EQ(solver.mGetRidgeFactors()[0], 0.063 / 2.0);
    EXPECT_EQ(solver.mGetRidgeFactors()[1], 1.0);
    EXPECT_EQ(solver.mGetRidgeFactors()[2], 16.0);
}

// At t = 0, -t^4 + t^2 has zero gradient but a minimum: the ridge-repaired step is zero, and a
// repaired step never counts towards convergence, so the iterations run out (code 7) instead of
// reporting the minimum as converged.
TEST(NewtonRaphson, RepairedStepNeverConverges) {
    TestObjective f;
    f.value = [](const Vector& t) { return -std::pow(t[0], 4) + t[0] * t[0]; };
    f.gradient = [](const Vector& t) { return Vector{-4.0 * std::pow(t[0], 3) + 2.0 * t[0]}; };
    f.negHessian = [](const Vector& t) { return std::vector<Vector>{{12.0 * t[0] * t[0] - 2.0}}; };
    f.start = {0.0};
    NewtonRaphson solver(&f, 1, true);
    const Outcome out = optimise(solver);
    EXPECT_EQ(out.resultCode, 7);
    EXPECT_EQ(out.theta, Vector{0.0});
    EXPECT_EQ(out.matrixCode, 2);
    // Fifty acceptances at the first attempt stop halving at the first value not above 1e-4.
    EXPECT_EQ(solver.mGetRidgeFactors()[0], 0.063 / 1024.0);
}

// After seven halvings the search also settles for a value better than twice the previous one:
// from -10 (maximising), values below -20 are halved, and the first above -20 ends the search
// although it is still worse than -10. The objective misreports its slope to force this.
TEST(NewtonRaphson, HalvingSettlesForTwiceThePreviousValue) {
    TestObjective f;
    f.value = [](const Vector& t) { return -10.0 - std::fabs(t[0]); };
    f.gradient = [](const Vector&) { return Vector{1.0}; };
    f.negHessian = [](const Vector&) { return std::vector<Vector>{{1.0 / 1024.0}}; };
    f.start = {0.0};
    NewtonRaphson solver(&f, 1, true);
    solver.mSetMaximumNumberOfIterations(1);
    const Outcome out = optimise(solver);
    // Steps 1024, 512, ..., 16 give values below -20; the seventh halving, to 8, gives -18.
    EXPECT_EQ(out.theta, Vector{8.0});
    EXPECT_EQ(solver.mGetFunction(), -18.0);
    EXPECT_EQ(f.evaluations, 9);
    EXPECT_EQ(out.resultCode, 4);
}

// g.t - t'Ht/2 with H = [[1, 2], [2, 1]] has no maximum: every factorisation fails at column 1
// with pivot 3 and needs a ridge, and the iterations run out with the last step adjusted.
TEST(NewtonRaphson, SaddleExhaustsIterationsWithAdjustedMatrix) {
    TestObjective f;
    f.value = [](const Vector& t) {
        return 0.01 * (t[0] + t[1]) - 0.5 * (t[0] * t[0] + 4.0 * t[0] * t[1] + t[1] * t[1]);
    };
    f.gradient = [](const Vector& t) {
        return Vector{0.01 - t[0] - 2.0 * t[1], 0.01 - 2.0 * t[0] - t[1]};
    };
    f.negHessian = [](const Vector&) { return std::vector<Vector>{{1.0, 2.0}, {2.0, 1.0}}; };
    f.start = {0.0, 0.0};
    NewtonRaphson solver(&f, 2, true);
    const Outcome out = optimise(solver);
    EXPECT_FALSE(out.converged);
    EXPECT_EQ(out.resultCode, 7);
    // No fixed point at the failing column: no covariance at all.
    EXPECT_EQ(out.matrixCode, 2);
    EXPECT_TRUE(std::isnan(out.covariance(0, 0)));
    EXPECT_TRUE(std::isnan(out.covariance(1, 1)));
    // Each acceptance at the first attempt halves the first factor, down to the first value not
    // above 1e-4.
    const double first = solver.mGetRidgeFactors()[0];
    EXPECT_LT(first, 0.063);
    EXPECT_GE(first, 0.063 / 1024.0);
    EXPECT_EQ(std::fmod(0.063 / first, 2.0), 0.0);
}

TEST(NewtonRaphson, SingularCovarianceAtFixedPointColumnIsReduced) {
    TestObjective f;
    f.value = [](const Vector& t) { return -(t[0] - 1.0) * (t[0] - 1.0); };
    f.gradient = [](const Vector& t) { return Vector{-2.0 * (t[0] - 1.0), 0.0}; };
    f.negHessian = [](const Vector&) { return std::vector<Vector>{{2.0, 0.0}, {0.0, 0.0}}; };
    f.start = {0.0, 0.0};
    f.fixedPoints = {kNaN, 7.0};
    NewtonRaphson solver(&f, 2, true);
    solver.mSetMaximumNumberOfIterations(0);
    const Outcome out = optimise(solver);
    EXPECT_EQ(out.matrixCode, 1);
    EXPECT_EQ(out.eliminated, 1);
    EXPECT_DOUBLE_EQ(out.covariance(0, 0), 0.5);
    EXPECT_EQ(out.covariance(1, 0), 0.0);
    EXPECT_EQ(out.covariance(1, 1), 0.0);
}

TEST(NewtonRaphson, ExhaustedIterationCodes) {
    struct Case {
        const char* name;
        double scale, start;
        int iterations, expected;
    };
    // -scale * t^2 from `start`: one exact step to 0.
    const Case cases[] = {
        // A flat objective: the value settles, the estimate moves far.
        {"function only", 1e-8, 5.0, 1, 3},
        // A steep one: the estimate moves by less than its tolerance, the value by more.
        {"estimates only", 1e12, 1e-7, 1, 2},
        {"neither", 1.0, 5.0, 1, 4},
        {"both after two", 1.0, 5.0, 2, 0},
    };
    for (const Case& c : cases) {
        TestObjective f;
        const double scale = c.scale;
        f.value = [scale](const Vector& t) { return -scale * t[0] * t[0]; };
        f.gradient = [scale](const Vector& t) { return Vector{-2.0 * scale * t[0]}; };
        f.negHessian = [scale](const Vector&) { return std::vector<Vector>{{2.0 * scale}}; };
        f.start = {c.start};
        NewtonRaphson solver(&f, 1, true);
        solver.mSetMaximumNumberOfIterations(c.iterations);
        EXPECT_EQ(optimise(solver).resultCode, c.expected) << c.name;
    }
}

// A negative Hessian that is almost zero sends the Newton step to infinity; halving cannot bring
// an infinite step back, and the value there is far worse than before: divergence.
TEST(NewtonRaphson, RunawayStepDiverges) {
    TestObjective f;
    f.value = [](const Vector& t) { return -std::fmin(t[0] * t[0], 1e6) - 1.0; };
    f.gradient = [](const Vector& t) { return Vector{-2.0 * t[0]}; };
    f.negHessian = [](const Vector&) { return std::vector<Vector>{{1e-320}}; };
    f.start = {1.0};
    NewtonRaphson solver(&f, 1, true);
    const Outcome out = optimise(solver);
    EXPECT_FALSE(out.converged);
    EXPECT_EQ(out.resultCode, 8);
    EXPECT_LT(f.evaluations, 5000);
}

// The maximum of -(a - 1)^2 - (b - 3)^2 - (a - b)^2 lies beyond b = 2, where the objective
// ends: b = 2 is parameter 1's fixed point, and the objective reports stepping past it. The
// optimum holds b there and maximises over a alone: a = 1.5.
TestObjective boundedCoupledQuadratic() {
    TestObjective f;
    f.value = [](const Vector& t) {
        const double a = t[0], b = t[1];
        return -(a - 1.0) * (a - 1.0) - (b - 3.0) * (b - 3.0) - (a - b) * (a - b);
    };
    f.gradient = [](const Vector& t) {
        const double a = t[0], b = t[1];
        return Vector{-2.0 * (a - 1.0) - 2.0 * (a - b), -2.0 * (b - 3.0) + 2.0 * (a - b)};
    };
    f.negHessian = [](const Vector&) { return std::vector<Vector>{{4.0, -2.0}, {-2.0, 4.0}}; };
    f.valid = [](const Vector& t) { return t[1] <= 2.0; };
    f.atFixedPoint = [](const Vector& t) { return t[1] >= 2.0 ? 1 : -1; };
    f.start = {0.0, 0.0};
    f.fixedPoints = {kNaN, 2.0};
    return f;
}

TEST(NewtonRaphson, FixedPointHoldsParameter) {
    TestObjective f = boundedCoupledQuadratic();
    NewtonRaphson solver(&f, 2, true);
    solver.mSetToleranceFunction(1e-10);
    solver.mSetToleranceMaxArguments(1e-10);
    const Outcome out = optimise(solver);
    EXPECT_EQ(out.resultCode, 0);
    EXPECT_EQ(out.theta[1], 2.0);
    EXPECT_NEAR(out.theta[0], 1.5, 1e-9);
    EXPECT_NEAR(solver.mGetFunction(), -1.5, 1e-9);
    // Without irregular-function checking the covariance is the full inverse of [[4,-2],[-2,4]].
    EXPECT_EQ(out.matrixCode, 0);
    EXPECT_NEAR(out.covariance(0, 0), 1.0 / 3.0, 1e-15);
    EXPECT_NEAR(out.covariance(1, 0), 1.0 / 6.0, 1e-15);
    EXPECT_EQ(f.biasCorrections, 0);
}

TEST(NewtonRaphson, FixedParameterPasses) {
    TestObjective f = boundedCoupledQuadratic();
    NewtonRaphson solver(&f, 2, true);
    solver.mSetToleranceFunction(1e-10);
    solver.mSetToleranceMaxArguments(1e-10);
    solver.mCheckIrregularFunction(true);
    const Outcome out = optimise(solver);
    EXPECT_EQ(out.resultCode, 0);
    EXPECT_EQ(out.theta[1], 2.0);
    EXPECT_NEAR(out.theta[0], 1.5, 1e-9);
    EXPECT_GE(f.biasCorrections, 2);  // before the passes and after each
    // Parameter 1 is held: its row and column are zero, the rest is 1 / 4.
    EXPECT_EQ(out.matrixCode, 1);
    EXPECT_EQ(out.eliminated, 1);
    EXPECT_NEAR(out.covariance(0, 0), 0.25, 1e-15);
    EXPECT_EQ(out.covariance(1, 0), 0.0);
    EXPECT_EQ(out.covariance(1, 1), 0.0);
}

TEST(NewtonRaphson, IterationHistoryIsHandedToTheObjective) {
    TestObjective f = concaveQuadratic();
    NewtonRaphson solver(&f, 1, true);
    solver.mSetDisplayIterationHistory();
    optimise(solver);
    EXPECT_TRUE(f.historyTableSetUp);
    ASSERT_EQ(f.historyRows.size(), 3u);
    const double expected[] = {-9.0, 0.0, 0.0};
    for (int k = 0; k < 3; ++k) {
        EXPECT_EQ(f.historyRows[k].first, k);
        EXPECT_NEAR(f.historyRows[k].second, expected[k], 1e-20);
    }
}

// Poisson regression on a quadratic in x: a smooth three-parameter likelihood whose maximum
// has zero score and whose covariance is the inverse Fisher information there.
TEST(NewtonRaphson, ThreeParameterLikelihood) {
    std::vector<double> xs, counts;
    for (int i = 0; i < 40; ++i) {
        const double x = i / 20.0;
        xs.push_back(x);
        counts.push_back(std::floor(std::exp(0.5 + 0.8 * x - 0.3 * x * x) + 0.5 * (i % 3)));
    }
    auto features = [](double x) { return Vector{1.0, x, x * x}; };
    TestObjective f;
    f.value = [=](const Vector& b) {
        double sum = 0.0;
        for (std::size_t i = 0; i < xs.size(); ++i) {
            const double eta = b[0] + b[1] * xs[i] + b[2] * xs[i] * xs[i];
            sum += counts[i] * eta - std::exp(eta);
        }
        return sum;
    };
    f.gradient = [=](const Vector& b) {
        Vector g(3, 0.0);
        for (std::size_t i = 0; i < xs.size(); ++i) {
            const Vector z = features(xs[i]);
            const double mean = std::exp(b[0] + b[1] * z[1] + b[2] * z[2]);
            for (int k = 0; k < 3; ++k) g[k] += (counts[i] - mean) * z[k];
        }
        return g;
    };
    f.negHessian = [=](const Vector& b) {
        std::vector<Vector> h(3, Vector(3, 0.0));
        for (std::size_t i = 0; i < xs.size(); ++i) {
            const Vector z = features(xs[i]);
            const double mean = std::exp(b[0] + b[1] * z[1] + b[2] * z[2]);
            for (int r = 0; r < 3; ++r) {
                for (int c = 0; c < 3; ++c) h[r][c] += mean * z[r] * z[c];
            }
        }
        return h;
    };
    f.start = {0.0, 0.0, 0.0};
    NewtonRaphson solver(&f, 3, true);
    solver.mSetToleranceFunction(1e-12);
    solver.mSetToleranceMaxArguments(1e-10);
    const Outcome out = optimise(solver);
    ASSERT_EQ(out.resultCode, 0);
    EXPECT_EQ(out.matrixCode, 0);
    for (double score : f.gradient(out.theta)) EXPECT_NEAR(score, 0.0, 1e-8);

    // covariance x information = identity
    const std::vector<Vector> information = f.negHessian(out.theta);
    for (int r = 0; r < 3; ++r) {
        for (int c = 0; c < 3; ++c) {
            double product = 0.0;
            for (int k = 0; k < 3; ++k) product += out.covariance(r, k) * information[k][c];
            EXPECT_NEAR(product, r == c ? 1.0 : 0.0, 1e-10) << r << "," << c;
        }
    }
}

}  // namespace
}  // namespace kelstat
