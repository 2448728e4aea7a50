// Calls per second of XGAMMLN, psi and mIncompleteGamma over fixed argument grids; the
// incomplete gamma ratio also per method (small shapes, moderate shapes, large shapes near and
// away from x = a).
#include <benchmark/benchmark.h>

#include <cmath>
#include <random>
#include <vector>

#include "specfun/gamma_functions.h"
#include "specfun/polygamma.h"

namespace {

constexpr int kGridSize = 4096;

// Log-uniform arguments in [low, high], the same on every run.
std::vector<double> logUniformGrid(double low, double high, unsigned seed) {
    std::mt19937_64 random(seed);
    std::uniform_real_distribution<double> unit(0.0, 1.0);
    std::vector<double> values(kGridSize);
    for (double& value : values) {
        value = std::exp(std::log(low) + (std::log(high) - std::log(low)) * unit(random));
    }
    return values;
}

// Runs `function` over the grid, one call per iteration.
template <typename Function>
void runOverGrid(benchmark::State& state, const std::vector<double>& grid, Function function) {
    std::size_t index = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(function(grid[index]));
        index = (index + 1) % grid.size();
    }
    state.SetItemsProcessed(state.iterations());
}

void BM_LogGamma(benchmark::State& state) {
    const auto grid = logUniformGrid(0.5, 1e6, 1);
    runOverGrid(state, grid, [](double x) { return kelstat::XGAMMLN(x); });
}
BENCHMARK(BM_LogGamma);

void BM_Psi(benchmark::State& state) {
    const auto grid = logUniformGrid(1e-3, 1e6, 2);
    runOverGrid(state, grid, [](double x) { return kelstat::psi(x); });
}
BENCHMARK(BM_Psi);

struct ShapeAndLimit {
    double a;
    double x;
};

enum class Region { kMixed, kSmallShape, kModerateShape, kLargeNearMean, kLargeAway };

std::vector<ShapeAndLimit> incompleteGammaGrid(Region region) {
    std::mt19937_64 random(654);
    std::uniform_real_distribution<double> unit(0.0, 1.0);
    const auto logUniform = [&](double low, double high) {
        return std::exp(std::log(low) + (std::log(high) - std::log(low)) * unit(random));
    };
    std::vector<ShapeAndLimit> grid(kGridSize);
    for (int i = 0; i < kGridSize; ++i) {
        const Region kind = region == Region::kMixed ? static_cast<Region>(1 + i % 4) : region;
        double a = 1.0;
        double x = 1.0;
        switch (kind) {
            case Region::kSmallShape:
                a = logUniform(1e-6, 0.999);
                x = logUniform(1e-4, 50.0);
                break;
            case Region::kModerateShape:
                a = 1.0 + 19.0 * unit(random);
                x = logUniform(0.1, 100.0);
                break;
            case Region::kLargeNearMean:
                a = logUniform(20.0, 1e6);
                x = a + (2.0 * unit(random) - 1.0) * 3.0 * std::sqrt(a);
                break;
            case Region::kLargeAway:
                a = logUniform(20.0, 1e6);
                x = a * (unit(random) < 0.5 ? logUniform(0.05, 0.5) : logUniform(1.5, 5.0));
                break;
            case Region::kMixed:
                break;
        }
        grid[i] = {a, x};
    }
    return grid;
}

void BM_IncompleteGamma(benchmark::State& state) {
    const auto grid = incompleteGammaGrid(static_cast<Region>(state.range(0)));
    std::size_t index = 0;
    for (auto _ : state) {
        benchmark::DoNotOptimize(kelstat::mIncompleteGamma(grid[index].x, grid[index].a));
        index = (index + 1) % grid.size();
    }
    state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_IncompleteGamma)
    ->ArgName("region")
    ->Arg(static_cast<int>(Region::kMixed))
    ->Arg(static_cast<int>(Region::kSmallShape))
    ->Arg(static_cast<int>(Region::kModerateShape))
    ->Arg(static_cast<int>(Region::kLargeNearMean))
    ->Arg(static_cast<int>(Region::kLargeAway));

}  // namespace

BENCHMARK_MAIN();
