// Logistic and exponential tolerance intervals: the two-sided exponential factor across sample
// sizes and levels (one benchmark per case, plus a sweep that reports the median over every case
// whose solve converges), and a whole two-sided logistic request at n = 20, fit included.
//
//   build/<dir>/bench/bench_logistic_exponential --benchmark_min_time=0.2
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <ctime>
#include <random>
#include <vector>

#include "kelstat.h"
#include "qdr.h"
#include "tolerance/exponential_model.h"

namespace {

constexpr double kLevels[] = {0.90, 0.95, 0.99};

// The two-sided factors of an exponential sample of n ones (the factors do not depend on the
// values); returns the lower factor so that the work cannot be optimised away.
double exponentialTwoSided(const std::vector<double>& sample, double confidence,
                           double proportion) {
    kelstat::ExponentialModelTI model(sample.data(), static_cast<uint32_t>(sample.size()), 0.05,
                                      0.95, kel_TwoSided);
    model.executeToleranceInterval(kel_TwoSided, confidence, proportion);
    return model.lowerKFactor;
}

// Arguments: n, index of the confidence level, index of the proportion.
void BM_ExponentialTwoSidedFactor(benchmark::State& state) {
    const std::vector<double> sample(static_cast<std::size_t>(state.range(0)), 1.0);
    const double confidence = kLevels[state.range(1)];
    const double proportion = kLevels[state.range(2)];
    for (auto _ : state) {
        benchmark::DoNotOptimize(exponentialTwoSided(sample, confidence, proportion));
    }
}
BENCHMARK(BM_ExponentialTwoSidedFactor)
    ->ArgsProduct({{2, 5, 10, 20, 100, 1000}, {0, 1, 2}, {0, 1, 2}})
    ->Unit(benchmark::kMicrosecond);

// This thread's processor time in microseconds: on a shared machine, wall time mostly measures
// the other processes.
double threadMicroseconds() {
    timespec now{};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return static_cast<double>(now.tv_sec) * 1e6 + static_cast<double>(now.tv_nsec) * 1e-3;
}

// Every n from 2 to 1000 at the nine level pairs; each case is timed over a few calls (its best
// thread time), and the median over the cases with finite factors is reported as the counter
// median_us, with the slowest such case as max_us.
void BM_ExponentialTwoSidedSweep(benchmark::State& state) {
    constexpr int kCallsPerCase = 3;
    std::vector<double> caseTimes;
    int unsolved = 0;
    for (auto _ : state) {
        caseTimes.clear();
        unsolved = 0;
        for (int n = 2; n <= 1000; ++n) {
            const std::vector<double> sample(static_cast<std::size_t>(n), 1.0);
            for (double confidence : kLevels) {
                for (double proportion : kLevels) {
                    double best = INFINITY;
                    double factor = 0.0;
                    for (int call = 0; call < kCallsPerCase; ++call) {
                        const double start = threadMicroseconds();
                        factor = exponentialTwoSided(sample, confidence, proportion);
                        best = std::min(best, threadMicroseconds() - start);
                    }
                    if (std::isnan(factor)) {
                        ++unsolved;
                    } else {
                        caseTimes.push_back(best);
                    }
                }
            }
        }
    }
    std::sort(caseTimes.begin(), caseTimes.end());
    state.counters["median_us"] = caseTimes.empty() ? NAN : caseTimes[caseTimes.size() / 2];
    state.counters["max_us"] = caseTimes.empty() ? NAN : caseTimes.back();
    state.counters["cases"] = static_cast<double>(caseTimes.size());
    state.counters["nan_cases"] = unsolved;
}
BENCHMARK(BM_ExponentialTwoSidedSweep)->Iterations(1)->Unit(benchmark::kMillisecond);

std::vector<double> logisticSample(int n) {
    std::mt19937_64 generator(20261123);
    std::uniform_real_distribution<double> uniform(0.0, 1.0);
    std::vector<double> values(static_cast<std::size_t>(n));
    for (double& value : values) {
        const double u = uniform(generator);
        value = 10.0 + 2.0 * std::log(u / (1.0 - u));
    }
    return values;
}

// A whole two-sided request through the entry point: fit with covariances, factor, limits.
void BM_LogisticTwoSidedInterval(benchmark::State& state) {
    const std::vector<double> values = logisticSample(static_cast<int>(state.range(0)));
    const auto count = static_cast<uint32_t>(values.size());
    for (auto _ : state) {
        kel_ParametricTIData record{};
        record.distribution = KEL_DIST_LOGISTIC;
        record.confidenceType = kel_TwoSided;
        record.confidenceLevel = 0.95;
        record.proportion = 0.90;
        benchmark::DoNotOptimize(
            kel_CalcParametricToleranceInterval(values.data(), count, &record));
        benchmark::DoNotOptimize(record.lowerLimit);
    }
}
BENCHMARK(BM_LogisticTwoSidedInterval)->Arg(20)->Arg(1000)->Unit(benchmark::kMicrosecond);

// The companion's share of a logistic request: the fit alone.
void BM_LogisticFitAlone(benchmark::State& state) {
    const std::vector<double> values = logisticSample(static_cast<int>(state.range(0)));
    const auto count = static_cast<uint32_t>(values.size());
    for (auto _ : state) {
        double fit[2];
        double cov[3];
        benchmark::DoNotOptimize(qdr_FitLogisticWithCovariances(values.data(), fit, cov, count));
    }
}
BENCHMARK(BM_LogisticFitAlone)->Arg(20)->Unit(benchmark::kMicrosecond);

// The chi-square functions the exponential objective calls, at the degrees of freedom 2n.
void BM_ChiSquareCdf(benchmark::State& state) {
    const double df = static_cast<double>(2 * state.range(0));
    for (auto _ : state) {
        benchmark::DoNotOptimize(qdr_GetChiSqCdf(QDR_LOWER_TAIL, 1.3 * df, df, 0.0));
    }
}
BENCHMARK(BM_ChiSquareCdf)->Arg(2)->Arg(10)->Arg(100)->Arg(1000)->Unit(benchmark::kNanosecond);

void BM_ChiSquarePdf(benchmark::State& state) {
    const double df = static_cast<double>(2 * state.range(0));
    for (auto _ : state) benchmark::DoNotOptimize(qdr_GetChiSqPdf(1.3 * df, df));
}
BENCHMARK(BM_ChiSquarePdf)->Arg(2)->Arg(1000)->Unit(benchmark::kNanosecond);

void BM_ChiSquareQuantile(benchmark::State& state) {
    const double df = static_cast<double>(2 * state.range(0));
    for (auto _ : state) benchmark::DoNotOptimize(qdr_GetChiSqInvCdf(0.975, df, 0.0));
}
BENCHMARK(BM_ChiSquareQuantile)->Arg(2)->Arg(1000)->Unit(benchmark::kNanosecond);

}  // namespace

BENCHMARK_MAIN();
