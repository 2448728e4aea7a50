// Stem-and-leaf end to end as a host calls it: scale, create, run, delete, on sorted columns of
// 10^3 and 10^7 values. Reports time per value and the peak of the library's own allocations
// relative to the column's size; the allocations are counted by replacing the global operator
// new and delete in this program.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <map>
#include <new>
#include <random>
#include <vector>

#include "kelstat.h"

namespace {

// Bytes currently allocated through operator new, and the most at any one time. The program is
// single-threaded while measuring.
std::size_t gLiveBytes = 0;
std::size_t gPeakBytes = 0;

// Each block carries its size in front so that delete can subtract it; the header keeps the
// alignment of max_align_t.
constexpr std::size_t kHeader = alignof(std::max_align_t);

void* countedAllocate(std::size_t size) {
    void* block = std::malloc(size + kHeader);
    if (block == nullptr) throw std::bad_alloc();
    *static_cast<std::size_t*>(block) = size;
    gLiveBytes += size;
    gPeakBytes = std::max(gPeakBytes, gLiveBytes);
    return static_cast<char*>(block) + kHeader;
}

void countedRelease(void* pointer) {
    if (pointer == nullptr) return;
    void* block = static_cast<char*>(pointer) - kHeader;
    gLiveBytes -= *static_cast<std::size_t*>(block);
    std::free(block);
}

}  // namespace

void* operator new(std::size_t size) {
    return countedAllocate(size);
}
void* operator new[](std::size_t size) {
    return countedAllocate(size);
}
void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    try {
        return countedAllocate(size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}
void* operator new[](std::size_t size, const std::nothrow_t& tag) noexcept {
    return operator new(size, tag);
}
void operator delete(void* pointer) noexcept {
    countedRelease(pointer);
}
void operator delete[](void* pointer) noexcept {
    countedRelease(pointer);
}
void operator delete(void* pointer, std::size_t) noexcept {
    countedRelease(pointer);
}
void operator delete[](void* pointer, std::size_t) noexcept {
    countedRelease(pointer);
}
void operator delete(void* pointer, const std::nothrow_t&) noexcept {
    countedRelease(pointer);
}
void operator delete[](void* pointer, const std::nothrow_t&) noexcept {
    countedRelease(pointer);
}

namespace {

// Rainfall-like decimals with one decimal place, sorted; built once per size.
const std::vector<double>& sortedColumn(std::size_t n) {
    static std::map<std::size_t, std::vector<double>> columns;
    std::vector<double>& column = columns[n];
    if (column.empty()) {
        std::mt19937_64 random(12345);
        std::normal_distribution<double> spread(500.0, 100.0);
        column.resize(n);
        for (double& value : column) value = std::round(spread(random) * 10.0) / 10.0;
        std::sort(column.begin(), column.end());
    }
    return column;
}

bool showColumn(const std::vector<double>& column, bool trim) {
    kel_StemAndLeafScaleInfo scale{};
    scale.trimOutliers = trim ? 1 : 0;
    const auto n = static_cast<std::uint32_t>(column.size());
    if (kel_FindStemAndLeafScaleInfo(column.data(), n, &scale) != KEL_OK) return false;
    kel_StemAndLeaf* display = kel_CreateStemAndLeafContainer();
    const bool built = kel_RunStemAndLeaf(column.data(), n, &scale, display) == KEL_OK;
    benchmark::DoNotOptimize(display->lines);
    kel_DeleteStemAndLeafContainer(&display);
    return built;
}

void BM_StemLeafEndToEnd(benchmark::State& state) {
    const std::vector<double>& column = sortedColumn(static_cast<std::size_t>(state.range(0)));
    const bool trim = state.range(1) != 0;
    for (auto _ : state) {
        if (!showColumn(column, trim)) state.SkipWithError("the library refused the column");
    }
    const auto n = static_cast<double>(column.size());
    state.counters["time_per_value"] = benchmark::Counter(
        n, benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);

    // One more call, outside the timing, to see the most memory the library held at once.
    const std::size_t before = gLiveBytes;
    gPeakBytes = gLiveBytes;
    showColumn(column, trim);
    const double columnBytes = n * sizeof(double);
    state.counters["peak_alloc_per_column_byte"] =
        static_cast<double>(gPeakBytes - before) / columnBytes;
}

BENCHMARK(BM_StemLeafEndToEnd)
    ->ArgNames({"n", "trim"})
    ->Args({1000, 0})
    ->Args({1000, 1})
    ->Args({10000000, 0})
    ->Args({10000000, 1})
    ->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();
