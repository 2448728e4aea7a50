// The one-dimensional toolkit: root finding and golden-section search on smooth functions.
#include <benchmark/benchmark.h>

#include <cmath>

#include "numerics/golden_section.h"
#include "numerics/real_function.h"
#include "numerics/root_finder.h"

namespace {

class Cosine : public kelstat::ZRXRealFunction {
  public:
    double operator()(double x) override { return std::cos(x); }
};

class ShiftedSquare : public kelstat::ZRXRealFunction {
  public:
    double operator()(double x) override { return (x - 1.0) * (x - 1.0); }
};

void BM_RootFinderCosine(benchmark::State& state) {
    Cosine f;
    for (auto _ : state) benchmark::DoNotOptimize(kelstat::ZRXRootFinder(0.0, 3.0, f));
}
BENCHMARK(BM_RootFinderCosine);

void BM_GoldenSectionSquare(benchmark::State& state) {
    ShiftedSquare f;
    for (auto _ : state) benchmark::DoNotOptimize(kelstat::calcGoldenSection(0.0, 3.0, f, false));
}
BENCHMARK(BM_GoldenSectionSquare);

}  // namespace

BENCHMARK_MAIN();
