// Timings of the stand-in's hot paths: the noncentral quantiles the tolerance factors call, the
// distribution functions inside their integrands, and the three fits.
#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdint>
#include <random>
#include <vector>

#include "qdr.h"

namespace {

std::vector<double> uniforms(std::size_t count, std::uint64_t seed) {
    std::mt19937_64 generator(seed);
    std::vector<double> values(count);
    for (double& value : values) value = ((generator() >> 11) + 0.5) * 0x1p-53;
    return values;
}

// Gamma(shape 3) by the sum of three exponentials.
std::vector<double> gammaSample(std::size_t count) {
    const std::vector<double> u = uniforms(3 * count, 1);
    std::vector<double> values(count);
    for (std::size_t i = 0; i < count; ++i) {
        values[i] = -2.0 * (std::log(u[3 * i]) + std::log(u[3 * i + 1]) + std::log(u[3 * i + 2]));
    }
    return values;
}

std::vector<double> extremeValueSample(std::size_t count) {
    std::vector<double> values = uniforms(count, 2);
    for (double& value : values) value = 1.5 + 0.4 * std::log(-std::log1p(-value));
    return values;
}

std::vector<double> logisticSample(std::size_t count) {
    std::vector<double> values = uniforms(count, 3);
    for (double& value : values) value = 10.0 + 2.0 * std::log(value / (1.0 - value));
    return values;
}

// The 36 noncentralities x^2 / n of one two-sided normal factor (nodes spread over [0, 8.3]).
void BM_ChiSquareOneDfQuantile36(benchmark::State& state) {
    const double n = static_cast<double>(state.range(0));
    for (auto _ : state) {
        double total = 0.0;
        for (int node = 0; node < 36; ++node) {
            const double x = 8.3 * (node + 0.5) / 36.0;
            total += qdr_GetChiSqInvCdf(0.95, 1.0, x * x / n);
        }
        benchmark::DoNotOptimize(total);
    }
}
BENCHMARK(BM_ChiSquareOneDfQuantile36)->Arg(2)->Arg(100)->Arg(10000)->Unit(benchmark::kMicrosecond);

// Upper chi-square tails as the two-sided normal factor's integrand asks for them: arguments
// swept over +-4 standard deviations, and (Far) beyond eight, where the small tail is evaluated
// in extended precision.
void BM_ChiSquareUpperTail(benchmark::State& state) {
    const double df = static_cast<double>(state.range(0));
    const double deviation = std::sqrt(2.0 * df);
    const double offset = state.range(1) != 0 ? 10.0 : -4.0;
    double k = 0.0;
    for (auto _ : state) {
        const double x = df + (offset + k) * deviation;
        benchmark::DoNotOptimize(qdr_GetChiSqCdf(QDR_UPPER_TAIL, x, df, 0.0));
        k = k < 8.0 ? k + 0.01 : 0.0;
    }
}
BENCHMARK(BM_ChiSquareUpperTail)
    ->Args({9, 0})
    ->Args({99, 0})
    ->Args({9999, 0})
    ->Args({9999, 1})
    ->Unit(benchmark::kNanosecond);

void BM_GammaCdfIntegerShape(benchmark::State& state) {
    const double shape = static_cast<double>(state.range(0));
    double x = 0.5 * shape;
    for (auto _ : state) {
        benchmark::DoNotOptimize(qdr_GetGammaCdf(QDR_LOWER_TAIL, x, shape, 1.0, 0.0));
        x = x < 2.0 * shape ? x * 1.01 : 0.5 * shape;
    }
}
BENCHMARK(BM_GammaCdfIntegerShape)->Arg(20)->Arg(1000)->Unit(benchmark::kNanosecond);

// Noncentral t quantiles as the one-sided normal factor (delta = z_p sqrt(n)) and the
// extreme-value start (delta = -sqrt(n) ln(-ln p')) ask for them.
void BM_NoncentralTQuantile(benchmark::State& state) {
    const double n = static_cast<double>(state.range(0));
    const bool extremeValue = state.range(1) != 0;
    const double ncp =
        extremeValue ? -std::sqrt(n) * std::log(-std::log(0.1)) : 1.6448536269514722 * std::sqrt(n);
    for (auto _ : state) {
        benchmark::DoNotOptimize(qdr_GetTInvCdf(0.95, n - 1.0, ncp));
    }
}
BENCHMARK(BM_NoncentralTQuantile)
    ->Args({2, 0})
    ->Args({20, 0})
    ->Args({10000, 0})
    ->Args({1000000, 0})
    ->Args({20, 1})
    ->Args({1000000, 1})
    ->Unit(benchmark::kMicrosecond);

void BM_FitGamma(benchmark::State& state) {
    const std::vector<double> data = gammaSample(static_cast<std::size_t>(state.range(0)));
    double fit[2];
    for (auto _ : state) {
        benchmark::DoNotOptimize(
            qdr_FitGamma(data.data(), fit, static_cast<unsigned>(data.size())));
    }
}
BENCHMARK(BM_FitGamma)->Arg(20)->Arg(1000000)->Unit(benchmark::kMicrosecond);

void BM_FitGumbel(benchmark::State& state) {
    const std::vector<double> data = extremeValueSample(static_cast<std::size_t>(state.range(0)));
    double fit[2];
    for (auto _ : state) {
        benchmark::DoNotOptimize(
            qdr_FitGumbel(data.data(), fit, static_cast<unsigned>(data.size()), 0));
    }
}
BENCHMARK(BM_FitGumbel)->Arg(20)->Arg(1000000)->Unit(benchmark::kMicrosecond);

void BM_FitLogistic(benchmark::State& state) {
    const std::vector<double> data = logisticSample(static_cast<std::size_t>(state.range(0)));
    double fit[2];
    double cov[3];
    for (auto _ : state) {
        benchmark::DoNotOptimize(qdr_FitLogisticWithCovariances(
            data.data(), fit, cov, static_cast<unsigned>(data.size())));
    }
}
BENCHMARK(BM_FitLogistic)->Arg(20)->Arg(1000)->Unit(benchmark::kMicrosecond);

void BM_SampleMeanAndVariance(benchmark::State& state) {
    const std::vector<double> data = logisticSample(static_cast<std::size_t>(state.range(0)));
    double mean = 0.0;
    double variance = 0.0;
    for (auto _ : state) {
        qdr_GetSampleMeanAndVariance(data.data(), static_cast<unsigned>(data.size()), &mean,
                                     &variance);
        benchmark::DoNotOptimize(variance);
    }
}
BENCHMARK(BM_SampleMeanAndVariance)->Arg(1000000)->Unit(benchmark::kMicrosecond);

}  // namespace
BENCHMARK_MAIN();
