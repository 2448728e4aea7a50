// The six exported functions called from eight threads at once, on different records and data,
// give bit for bit what the same calls give one after another: the library keeps no state
// between calls and shares none between them.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "kelstat.h"

namespace {

using Bytes = std::vector<unsigned char>;

constexpr int kThreads = 8;
// Each thread goes through every call this often, starting at a different call each time, so
// that different models overlap in time.
constexpr int kRounds = 2;

template <class T>
void append(Bytes& out, const T& value) {
    const auto* first = reinterpret_cast<const unsigned char*>(&value);
    out.insert(out.end(), first, first + sizeof value);
}

void appendArray(Bytes& out, const std::int32_t* values, std::int64_t count) {
    if (count <= 0 || values == nullptr) return;
    const auto* first = reinterpret_cast<const unsigned char*>(values);
    out.insert(out.end(), first, first + count * sizeof(std::int32_t));
}

// Deterministic samples: location + scale x a variate (uniform, exponential or Cauchy-like)
// from a 64-bit linear congruential generator.
std::vector<double> sample(std::size_t n, double location, double scale, int shape,
                           std::uint64_t seed) {
    std::vector<double> values(n);
    std::uint64_t state = seed * 2 + 1;
    for (double& x : values) {
        state = state * 6364136223846793005ULL + 1442695040888963407ULL;
        const double uniform = (static_cast<double>(state >> 11) + 0.5) / 9007199254740992.0;
        double variate = uniform;
        if (shape == 1) variate = -std::log(uniform);
        if (shape == 2) variate = std::tan(3.14159 * (uniform - 0.5));
        x = location + scale * variate;
    }
    return values;
}

std::vector<double> sorted(std::vector<double> values) {
    std::sort(values.begin(), values.end());
    return values;
}

struct Call {
    std::string name;
    std::function<Bytes()> run;
};

Call parametric(std::uint32_t distribution, kel_ConfidenceType type, double confidence,
                double proportion, std::vector<double> data) {
    std::string name = "parametric " + std::to_string(distribution) + " type " +
                       std::to_string(type) + " n " + std::to_string(data.size());
    return {name, [=] {
                kel_ParametricTIData record;
                std::memset(&record, 0, sizeof record);
                record.distribution = distribution;
                record.confidenceType = type;
                record.confidenceLevel = confidence;
                record.proportion = proportion;
                const std::int32_t code = kel_CalcParametricToleranceInterval(
                    data.data(), static_cast<std::uint32_t>(data.size()), &record);
                Bytes out;
                append(out, code);
                append(out, record);
                return out;
            }};
}

Call nonparametric(kel_ConfidenceType type, double confidence, double proportion,
                   std::vector<double> data) {
    std::string name =
        "nonparametric type " + std::to_string(type) + " n " + std::to_string(data.size());
    return {name, [=] {
                kel_NonParametricTIData record;
                std::memset(&record, 0, sizeof record);
                record.confidenceType = type;
                record.confidenceLevel = confidence;
                record.proportion = proportion;
                const std::int32_t code = kel_CalcNonParametricToleranceInterval(
                    data.data(), static_cast<std::uint32_t>(data.size()), &record);
                Bytes out;
                append(out, code);
                append(out, record);
                return out;
            }};
}

// Find the scale, create, run, read every line, delete: the scale record and the whole content
// of the display become the result.
Call stemAndLeaf(double increment, bool trim, std::vector<double> data) {
    std::string name = "stem-and-leaf n " + std::to_string(data.size()) + (trim ? " trimmed" : "") +
                       (increment > 0 ? " increment" : "");
    return {name, [=] {
                kel_StemAndLeafScaleInfo scale;
                std::memset(&scale, 0, sizeof scale);
                scale.increment = increment;
                scale.trimOutliers = trim ? 1 : 0;
                const auto n = static_cast<std::uint32_t>(data.size());
                Bytes out;
                append(out, kel_FindStemAndLeafScaleInfo(data.data(), n, &scale));
                append(out, scale);
                kel_StemAndLeaf* display = kel_CreateStemAndLeafContainer();
                append(out, kel_RunStemAndLeaf(data.data(), n, &scale, display));
                append(out, display->lineCount);
                append(out, display->leafUnit);
                append(out, display->medianLine);
                append(out, display->isComplete);
                for (std::uint32_t i = 0; i < display->lineCount; ++i) {
                    const kel_StemAndLeafLine& line = display->lines[i];
                    append(out, line.depth);
                    append(out, line.stem);
                    append(out, line.isPositive);
                    append(out, line.leafCount);
                    appendArray(out, line.leaves, line.leafCount);
                }
                append(out, display->lowOutlierCount);
                appendArray(out, display->lowOutliers, display->lowOutlierCount);
                append(out, display->highOutlierCount);
                appendArray(out, display->highOutliers, display->highOutlierCount);
                kel_DeleteStemAndLeafContainer(&display);
                append(out, display == nullptr);
                return out;
            }};
}

std::vector<Call> everyKindOfCall() {
    std::vector<Call> calls;
    const auto positive = [](std::size_t n, std::uint64_t seed) {
        return sample(n, 5.0, 2.0, 1, seed);
    };
    // Normal: two-sided (quadrature and root finder) and one-sided (noncentral t).
    calls.push_back(parametric(KEL_DIST_NORMAL, kel_TwoSided, 0.95, 0.9, sample(12, 10, 3, 0, 1)));
    calls.push_back(parametric(KEL_DIST_NORMAL, kel_TwoSided, 0.99, 0.99, sample(40, -3, 1, 0, 2)));
    calls.push_back(parametric(KEL_DIST_NORMAL, kel_UpperBound, 0.9, 0.95, sample(25, 0, 1, 0, 3)));
    calls.push_back(parametric(KEL_DIST_LOGNORMAL, kel_TwoSided, 0.95, 0.95, positive(30, 4)));
    // Gamma: the maximum-likelihood fit, then the normal model on cube roots; and a failed fit.
    calls.push_back(parametric(KEL_DIST_GAMMA, kel_TwoSided, 0.95, 0.9, positive(50, 5)));
    calls.push_back(parametric(KEL_DIST_GAMMA, kel_LowerBound, 0.9, 0.9, positive(8, 6)));
    calls.push_back(parametric(KEL_DIST_GAMMA, kel_TwoSided, 0.95, 0.9, {2, 2, 2, 2, 2}));
    // Codes 3 to 8: the extreme-value fits and integrals, the exponential maximiser, the
    // logistic fits.
    for (std::uint32_t code = KEL_DIST_WEIBULL; code <= KEL_DIST_LOGISTIC; ++code) {
        calls.push_back(parametric(code, kel_TwoSided, 0.95, 0.9, positive(20, 10 + code)));
        calls.push_back(parametric(code, kel_LowerBound, 0.9, 0.95, positive(15, 20 + code)));
        calls.push_back(parametric(code, kel_UpperBound, 0.99, 0.9, positive(60, 30 + code)));
    }
    calls.push_back(parametric(KEL_DIST_EXPONENTIAL, kel_TwoSided, 0.99, 0.99, positive(3, 40)));
    calls.push_back(parametric(KEL_DIST_WEIBULL, kel_TwoSided, 0.95, 0.9, {1, 1, 1, 1}));
    calls.push_back(parametric(KEL_DIST_NORMAL, 7, 0.95, 0.9, sample(10, 0, 1, 0, 41)));
    // Nonparametric: the incomplete beta ratio inside the root finder.
    calls.push_back(nonparametric(kel_TwoSided, 0.95, 0.9, sorted(sample(100, 0, 1, 2, 50))));
    calls.push_back(nonparametric(kel_TwoSided, 0.99, 0.999, sorted(sample(5000, 0, 1, 0, 51))));
    calls.push_back(nonparametric(kel_LowerBound, 0.9, 0.95, sorted(sample(300, 0, 1, 1, 52))));
    calls.push_back(nonparametric(kel_UpperBound, 0.95, 0.99, sorted(sample(10, 0, 1, 0, 53))));
    // Stem-and-leaf: automatic and increment modes, trimmed and not, both sides of zero.
    calls.push_back(stemAndLeaf(0.0, false, sorted(sample(200, 0, 100, 0, 60))));
    calls.push_back(stemAndLeaf(0.0, true, sorted(sample(500, -50, 10, 2, 61))));
    calls.push_back(stemAndLeaf(2.5, false, sorted(sample(1000, -20, 40, 0, 62))));
    calls.push_back(stemAndLeaf(0.0, true, sorted(sample(50000, 1e6, 3e5, 1, 63))));
    calls.push_back(stemAndLeaf(0.0, false, {-0.0, 0.0, 1.0, 2.5, 1e12}));
    return calls;
}

TEST(Concurrency, EightThreadsGiveTheSerialResultsBitForBit) {
    const std::vector<Call> calls = everyKindOfCall();
    std::vector<Bytes> serial;
    for (const Call& call : calls) serial.push_back(call.run());

    // Each thread records the index of every call whose result differed; checked afterwards in
    // this thread.
    std::vector<std::vector<std::size_t>> mismatches(kThreads);
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([&, t] {
            for (int round = 0; round < kRounds; ++round) {
                for (std::size_t k = 0; k < calls.size(); ++k) {
                    const std::size_t index =
                        (k + t * calls.size() / kThreads + round) % calls.size();
                    if (calls[index].run() != serial[index]) mismatches[t].push_back(index);
                }
            }
        });
    }
    for (std::thread& thread : threads) thread.join();

    for (int t = 0; t < kThreads; ++t) {
        for (std::size_t index : mismatches[t]) {
            ADD_FAILURE() << "thread " << t << ": " << calls[index].name << " differs";
        }
    }
}

}  // namespace
