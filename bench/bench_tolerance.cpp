// Tolerance intervals: the two-sided normal K-factor across sample sizes and levels, and whole
// entry-point calls on a million observations.
//
//   build/<dir>/bench/bench_tolerance --benchmark_min_time=0.2 --benchmark_repetitions=5
//       --benchmark_report_aggregates_only=true   (one line)
#include <benchmark/benchmark.h>

#include <algorithm>
#include <random>
#include <vector>

#include "kelstat.h"
#include "tolerance/normal_model.h"

namespace {

constexpr double kLevels[] = {0.90, 0.95, 0.99};
constexpr int kMillion = 1000000;

// Arguments: n, index of the confidence level, index of the proportion.
void BM_NormalTwoSidedKFactor(benchmark::State& state) {
    const double n = static_cast<double>(state.range(0));
    const double alpha = 1.0 - kLevels[state.range(1)];
    const double proportion = kLevels[state.range(2)];
    for (auto _ : state) {
        benchmark::DoNotOptimize(kelstat::normalTwoSidedKFactor(n, alpha, proportion));
    }
}
BENCHMARK(BM_NormalTwoSidedKFactor)
    ->ArgsProduct({{2, 3, 5, 10, 30, 100, 300, 1000, 3000, 10000}, {0, 1, 2}, {0, 1, 2}})
    ->Unit(benchmark::kMicrosecond);

void BM_NormalOneSidedKFactor(benchmark::State& state) {
    const double n = static_cast<double>(state.range(0));
    for (auto _ : state) {
        benchmark::DoNotOptimize(kelstat::normalOneSidedKFactor(n, 0.05, 0.95));
    }
}
BENCHMARK(BM_NormalOneSidedKFactor)->Arg(2)->Arg(100)->Arg(10000)->Unit(benchmark::kMicrosecond);

std::vector<double> sample(bool positive) {
    std::mt19937_64 generator(20261123);
    std::vector<double> values(kMillion);
    if (positive) {
        std::gamma_distribution<double> gamma(3.0, 2.0);
        for (double& value : values) value = gamma(generator);
    } else {
        std::normal_distribution<double> normal(10.0, 2.0);
        for (double& value : values) value = normal(generator);
    }
    return values;
}

void runParametric(benchmark::State& state, uint32_t distribution, bool positive) {
    const std::vector<double> values = sample(positive);
    for (auto _ : state) {
        kel_ParametricTIData record{};
        record.distribution = distribution;
        record.confidenceType = kel_TwoSided;
        record.confidenceLevel = 0.95;
        record.proportion = 0.90;
        benchmark::DoNotOptimize(
            kel_CalcParametricToleranceInterval(values.data(), kMillion, &record));
        benchmark::DoNotOptimize(record);
    }
}

void BM_NormalMillion(benchmark::State& state) {
    runParametric(state, KEL_DIST_NORMAL, false);
}
BENCHMARK(BM_NormalMillion)->Unit(benchmark::kMillisecond);

void BM_GammaMillion(benchmark::State& state) {
    runParametric(state, KEL_DIST_GAMMA, true);
}
BENCHMARK(BM_GammaMillion)->Unit(benchmark::kMillisecond);

void BM_NonParametricMillion(benchmark::State& state) {
    std::vector<double> values = sample(false);
    std::sort(values.begin(), values.end());
    for (auto _ : state) {
        kel_NonParametricTIData record{};
        record.confidenceType = static_cast<kel_ConfidenceType>(state.range(0));
        record.confidenceLevel = 0.95;
        record.proportion = 0.90;
        benchmark::DoNotOptimize(
            kel_CalcNonParametricToleranceInterval(values.data(), kMillion, &record));
        benchmark::DoNotOptimize(record);
    }
}
BENCHMARK(BM_NonParametricMillion)->Arg(0)->Arg(-1)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
