// Two-sided Weibull tolerance intervals, fit included: through the entry point (node values
// computed once, range shared by both factors, points too small to change a sum left out) and
// through the straightforward evaluation of the same equation.
//
//   build/<dir>/bench/bench_extreme_value --benchmark_min_time=0.2 --benchmark_repetitions=5
//       --benchmark_report_aggregates_only=true
#include <benchmark/benchmark.h>

#include <random>
#include <vector>

#include "kelstat.h"
#include "tolerance/extreme_value_models.h"

namespace {

std::vector<double> weibullSample(int n) {
    std::mt19937_64 generator(20261123);
    std::weibull_distribution<double> weibull(2.0, 10.0);
    std::vector<double> values(static_cast<std::size_t>(n));
    for (double& value : values) value = weibull(generator);
    return values;
}

void BM_WeibullTwoSided(benchmark::State& state) {
    const std::vector<double> values = weibullSample(static_cast<int>(state.range(0)));
    for (auto _ : state) {
        kel_ParametricTIData record{};
        record.distribution = KEL_DIST_WEIBULL;
        record.confidenceType = kel_TwoSided;
        record.confidenceLevel = 0.95;
        record.proportion = 0.9;
        benchmark::DoNotOptimize(kel_CalcParametricToleranceInterval(
            values.data(), static_cast<uint32_t>(values.size()), &record));
        benchmark::DoNotOptimize(record.upperLimit);
    }
}
BENCHMARK(BM_WeibullTwoSided)->Arg(20)->Arg(1000)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_WeibullTwoSided)->Arg(1000000)->Iterations(1)->Unit(benchmark::kMillisecond);

// The same request with every integrand evaluated afresh (n exponentials per point and k).
void BM_WeibullTwoSidedStraightforward(benchmark::State& state) {
    const std::vector<double> values = weibullSample(static_cast<int>(state.range(0)));
    const double alpha = 0.05;
    const double proportion = 0.9;
    for (auto _ : state) {
        kelstat::WeibullModelTI model(values.data(), static_cast<uint32_t>(values.size()), alpha,
                                      proportion, kel_TwoSided);
        model.estimateTIBasedParameters();
        model.calcLowerKFactor(alpha * 0.5, (proportion + 1.0) * 0.5, model.lowerKFactor, -1,
                               kelstat::SevEvaluation::kStraightforward);
        model.calcLowerKFactor(1.0 - alpha * 0.5, 1.0 - (proportion + 1.0) * 0.5,
                               model.upperKFactor, 1, kelstat::SevEvaluation::kStraightforward);
        model.calcToleranceInterval();
        model.backTransFormEstimates();
        benchmark::DoNotOptimize(model.upperLimit);
    }
}
BENCHMARK(BM_WeibullTwoSidedStraightforward)->Arg(20)->Arg(1000)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
