// A three-parameter maximum-likelihood fit through NewtonRaphson: Poisson regression of counts on
// a quadratic in x, 200 observations, started from zero.
#include <benchmark/benchmark.h>

#include <cmath>
#include <vector>

#include "numerics/newton_raphson.h"

namespace {

using kelstat::FunctionFirstNegSecondDerivative;
using kelstat::NewtonRaphson;
using Vector = std::vector<double>;

class PoissonQuadraticLikelihood : public FunctionFirstNegSecondDerivative {
  public:
    explicit PoissonQuadraticLikelihood(int count) {
        for (int i = 0; i < count; ++i) {
            const double x = 2.0 * i / count;
            mX.push_back(x);
            mCounts.push_back(std::floor(std::exp(1.5 + 0.8 * x - 0.6 * x * x) + (i % 4) * 0.5));
        }
    }

    double calculateFunction(const Vector& b, bool* valid, int*, int) const override {
        double sum = 0.0;
        for (std::size_t i = 0; i < mX.size(); ++i) {
            const double eta = linearPredictor(b, mX[i]);
            sum += mCounts[i] * eta - std::exp(eta);
        }
        *valid = std::isfinite(sum);
        return sum;
    }
    void calculateFirstDerivative(const Vector& b, Vector& g, bool* valid) const override {
        g.assign(3, 0.0);
        for (std::size_t i = 0; i < mX.size(); ++i) {
            const double x = mX[i];
            const double residual = mCounts[i] - std::exp(linearPredictor(b, x));
            g[0] += residual;
            g[1] += residual * x;
            g[2] += residual * x * x;
        }
        *valid = true;
    }
    void calculateNegSecondDerivative(const Vector& b, const Vector&, SymmetricMatrix& h,
                                      bool* valid) const override {
        double moments[5] = {0.0, 0.0, 0.0, 0.0, 0.0};  // sum of mean * x^k
        for (std::size_t i = 0; i < mX.size(); ++i) {
            double term = std::exp(linearPredictor(b, mX[i]));
            for (double& moment : moments) {
                moment += term;
                term *= mX[i];
            }
        }
        for (int r = 0; r < 3; ++r) {
            for (int c = 0; c <= r; ++c) h(r, c) = moments[r + c];
        }
        *valid = true;
    }
    void calculateStartingEstimates(Vector& b) const override { b.assign(3, 0.0); }

  private:
    static double linearPredictor(const Vector& b, double x) {
        return b[0] + b[1] * x + b[2] * x * x;
    }

    Vector mX;
    Vector mCounts;
};

void BM_NewtonRaphsonThreeParameters(benchmark::State& state) {
    PoissonQuadraticLikelihood likelihood(200);
    int resultCode = -1;
    for (auto _ : state) {
        NewtonRaphson solver(&likelihood, 3, true);
        Vector estimates;
        NewtonRaphson::SymmetricMatrix covariance;
        solver.mCalculateOptimal(estimates, covariance);
        resultCode = solver.mGetResultCode();
        benchmark::DoNotOptimize(estimates.data());
    }
    if (resultCode != 0) state.SkipWithError("the fit did not converge");
}
BENCHMARK(BM_NewtonRaphsonThreeParameters);

}  // namespace

BENCHMARK_MAIN();
