// BRATIO calls per second over a fixed mixed grid that visits every method of the algorithm
// (power series, continued fraction, the two asymptotic expansions, the recurrences), and over
// each regime separately.
#include <benchmark/benchmark.h>

#include <cmath>
#include <random>
#include <vector>

#include "specfun/bratio.h"

namespace {

struct Arguments {
    double a;
    double b;
    double x;
    double y;
};

enum class Regime { kMixed, kSmallShapes, kModerate, kLargeNearMean, kLargeAwayFromMean };

// Deterministic points of one regime (or of all, mixed); x + y = 1 to rounding.
std::vector<Arguments> makeGrid(Regime regime, int count) {
    std::mt19937_64 random(708);
    std::uniform_real_distribution<double> unit(0.0, 1.0);
    const auto logUniform = [&](double low, double high) {
        return std::exp(std::log(low) + (std::log(high) - std::log(low)) * unit(random));
    };
    std::vector<Arguments> grid;
    for (int i = 0; i < count; ++i) {
        const Regime kind = regime == Regime::kMixed ? static_cast<Regime>(1 + i % 4) : regime;
        double a = 1.0;
        double b = 1.0;
        double x = 0.5;
        switch (kind) {
            case Regime::kSmallShapes:
                a = logUniform(1e-20, 1.0);
                b = logUniform(1e-3, 1e4);
                x = unit(random);
                break;
            case Regime::kModerate:
                a = logUniform(1.0, 40.0);
                b = logUniform(1.0, 40.0);
                x = unit(random);
                break;
            case Regime::kLargeNearMean:
            case Regime::kLargeAwayFromMean: {
                a = logUniform(150.0, 1e6);
                b = logUniform(150.0, 1e6);
                const double mean = a / (a + b);
                const double spread = std::sqrt(a * b / ((a + b) * (a + b) * (a + b + 1.0)));
                const double k = kind == Regime::kLargeNearMean ? 2.0 * unit(random) - 1.0
                                                                : 3.0 + 10.0 * unit(random);
                x = std::fmin(std::fmax(mean + k * spread, 1e-300), 1.0 - 1e-16);
                break;
            }
            case Regime::kMixed:
                break;
        }
        grid.push_back({a, b, x, 1.0 - x});
    }
    return grid;
}

void runGrid(benchmark::State& state, Regime regime) {
    const std::vector<Arguments> grid = makeGrid(regime, 4096);
    for (auto _ : state) {
        for (const Arguments& p : grid) {
            double w;
            double w1;
            int ierr;
            kelstat::BRATIO(p.a, p.b, p.x, p.y, &w, &w1, &ierr);
            benchmark::DoNotOptimize(w);
            benchmark::DoNotOptimize(w1);
        }
    }
    state.SetItemsProcessed(state.iterations() * static_cast<long>(grid.size()));
}

void BM_BratioMixed(benchmark::State& state) {
    runGrid(state, Regime::kMixed);
}
void BM_BratioSmallShapes(benchmark::State& state) {
    runGrid(state, Regime::kSmallShapes);
}
void BM_BratioModerate(benchmark::State& state) {
    runGrid(state, Regime::kModerate);
}
void BM_BratioLargeNearMean(benchmark::State& state) {
    runGrid(state, Regime::kLargeNearMean);
}
void BM_BratioLargeAwayFromMean(benchmark::State& state) {
    runGrid(state, Regime::kLargeAwayFromMean);
}

BENCHMARK(BM_BratioMixed);
BENCHMARK(BM_BratioSmallShapes);
BENCHMARK(BM_BratioModerate);
BENCHMARK(BM_BratioLargeNearMean);
BENCHMARK(BM_BratioLargeAwayFromMean);

}  // namespace

BENCHMARK_MAIN();
