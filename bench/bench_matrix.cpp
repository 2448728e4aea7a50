// Dense products (tiled against the plain triple loop) and LU solves of general systems.
#include <benchmark/benchmark.h>

#include <random>
#include <vector>

#include "matrix/matrix_arithmetic.h"
#include "matrix/matrix_ludecomposition.h"
#include "matrix/matrix_new.h"

namespace {

using vek::matrix_library::matrix;

matrix<double> randomSquare(int order, unsigned seed) {
    std::mt19937_64 engine(seed);
    std::uniform_real_distribution<double> uniform(-1.0, 1.0);
    matrix<double> a(order, order);
    for (int i = 0; i < order; ++i) {
        for (int j = 0; j < order; ++j) a(i, j) = uniform(engine);
    }
    return a;
}

void BM_TiledProduct(benchmark::State& state) {
    const int order = static_cast<int>(state.range(0));
    const matrix<double> a = randomSquare(order, 1);
    const matrix<double> b = randomSquare(order, 2);
    for (auto _ : state) {
        matrix<double> product = a * b;
        benchmark::DoNotOptimize(&product(0, 0));
    }
}
BENCHMARK(BM_TiledProduct)->Arg(100)->Arg(500)->Unit(benchmark::kMillisecond);

void BM_SlowMatrixMultiply(benchmark::State& state) {
    const int order = static_cast<int>(state.range(0));
    const matrix<double> a = randomSquare(order, 1);
    const matrix<double> b = randomSquare(order, 2);
    for (auto _ : state) {
        matrix<double> product = vek::matrix_library::SlowMatrixMultiply(a, b);
        benchmark::DoNotOptimize(&product(0, 0));
    }
}
BENCHMARK(BM_SlowMatrixMultiply)->Arg(100)->Arg(500)->Unit(benchmark::kMillisecond);

// Decomposition and one solve, as a caller with a single right-hand side pays for them.
void BM_LUSolve(benchmark::State& state) {
    const int order = static_cast<int>(state.range(0));
    const matrix<double> a = randomSquare(order, 3);
    const std::vector<double> b(static_cast<std::size_t>(order), 1.0);
    for (auto _ : state) {
        const vek::matrix_library::LUDecomposition lu(a);
        std::vector<double> x;
        benchmark::DoNotOptimize(lu.Solve(b, &x));
        benchmark::DoNotOptimize(x.data());
    }
}
BENCHMARK(BM_LUSolve)->Arg(100)->Arg(500)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
