// Gauss-Legendre rules from the eigen-system route, and one integration with a stored rule.
#include <benchmark/benchmark.h>

#include <cmath>
#include <vector>

#include "numerics/gauss_legendre.h"
#include "numerics/real_function.h"

namespace {

class Gaussian : public kelstat::ZRXRealFunction {
  public:
    double operator()(double x) override { return std::exp(-0.5 * x * x); }
};

// The normal model builds a 36-point rule once per call; 120 points is the largest rule in use.
void BM_FindGaussianQuadratureWeights(benchmark::State& state) {
    const auto order = static_cast<unsigned>(state.range(0));
    for (auto _ : state) {
        std::vector<double> nodes;
        std::vector<double> weights;
        benchmark::DoNotOptimize(kelstat::findGaussianQuadratureWeights(order, nodes, weights));
        benchmark::DoNotOptimize(nodes.data());
    }
}
BENCHMARK(BM_FindGaussianQuadratureWeights)
    ->Arg(16)
    ->Arg(36)
    ->Arg(120)
    ->Unit(benchmark::kMicrosecond);

void BM_IntegrateWithStoredRule(benchmark::State& state) {
    std::vector<double> nodes;
    std::vector<double> weights;
    kelstat::findGaussianQuadratureWeights(36, nodes, weights);
    Gaussian f;
    for (auto _ : state) {
        benchmark::DoNotOptimize(kelstat::calcGaussianIntegration(0.0, 8.3, nodes, weights, f));
    }
}
BENCHMARK(BM_IntegrateWithStoredRule);

}  // namespace

BENCHMARK_MAIN();
