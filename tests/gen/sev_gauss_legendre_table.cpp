// Writes src/tolerance/gauss_legendre_120_table.h: the 60 positive nodes of the 120-point
// Gauss-Legendre rule on [-1, 1], increasing, and their weights, each the correctly rounded double
// of the exact value.
//
// Method: Newton's method on P_120 in 50-digit binary floating point
// (boost::multiprecision::cpp_bin_float_50), started from cos(pi (i - 1/4) / (n + 1/2)), with P_n
// and P_n' from the three-term recurrence; weights 2 / ((1 - x^2) P_n'(x)^2). Newton stops when a
// step falls below 1e-45, so about 45 digits are exact; the conversion to double rounds to nearest.
//
// Build and run from the repository root:
//   g++ -std=c++17 -O2 tests/gen/sev_gauss_legendre_table.cpp -o /tmp/sev_gl_table
//   /tmp/sev_gl_table > src/tolerance/gauss_legendre_120_table.h
#include <boost/math/constants/constants.hpp>
#include <boost/multiprecision/cpp_bin_float.hpp>
#include <cstdio>
#include <utility>
#include <vector>

using Real = boost::multiprecision::cpp_bin_float_50;

namespace {

constexpr int kOrder = 120;

std::pair<Real, Real> legendreAndDerivative(int n, const Real& x) {
    Real lower = 1;
    Real value = x;
    for (int degree = 2; degree <= n; ++degree) {
        Real next = ((2 * degree - 1) * x * value - (degree - 1) * lower) / degree;
        lower = value;
        value = next;
    }
    return {value, n * (x * value - lower) / (x * x - 1)};
}

}  // namespace

int main() {
    const Real pi = boost::math::constants::pi<Real>();
    const Real stepLimit("1e-45");
    std::vector<double> nodes;
    std::vector<double> weights;
    // The guesses for i = n/2 + 1 .. n are the positive zeros in increasing order.
    for (int i = kOrder / 2 + 1; i <= kOrder; ++i) {
        Real x = -cos(pi * (i - Real(0.25)) / (kOrder + Real(0.5)));
        for (int iteration = 0; iteration < 200; ++iteration) {
            const auto [value, derivative] = legendreAndDerivative(kOrder, x);
            const Real step = value / derivative;
            x -= step;
            if (abs(step) < stepLimit) break;
        }
        const Real derivative = legendreAndDerivative(kOrder, x).second;
        const Real weight = 2 / ((1 - x * x) * derivative * derivative);
        nodes.push_back(x.convert_to<double>());
        weights.push_back(weight.convert_to<double>());
    }
    std::printf(
        "// The 120-point Gauss-Legendre rule on [-1, 1]: its 60 positive nodes in increasing "
        "order "
        "and\n"
        "// the weight of each. Every entry is the correctly rounded double of the exact value, "
        "found by\n"
        "// Newton's method on the Legendre polynomial P_120 (three-term recurrence) in 50-digit "
        "binary\n"
        "// floating point and rounded to nearest once; written by "
        "tests/gen/sev_gauss_legendre_table.cpp.\n"
        "// tests/tolerance/test_extreme_value_models.cpp checks it against the Golub-Welsch rule "
        "of\n"
        "// findGaussianQuadratureWeights(120). Included only by extreme_value_models.cpp.\n"
        "#ifndef KELSTAT_TOLERANCE_GAUSS_LEGENDRE_120_TABLE_H\n"
        "#define KELSTAT_TOLERANCE_GAUSS_LEGENDRE_120_TABLE_H\n\n"
        "namespace kelstat {\n\n"
        "inline constexpr int kGaussLegendre120Pairs = 60;\n\n"
        "// clang-format off\n"
        "inline constexpr double kGaussLegendre120Nodes[] = {\n");
    for (std::size_t i = 0; i < nodes.size(); ++i) {
        std::printf("    %.17g,  // %zu\n", nodes[i], i);
    }
    std::printf("};\n\ninline constexpr double kGaussLegendre120Weights[] = {\n");
    for (std::size_t i = 0; i < weights.size(); ++i) {
        std::printf("    %.17g,  // %zu\n", weights[i], i);
    }
    std::printf(
        "};\n"
        "// clang-format on\n\n"
        "static_assert(sizeof(kGaussLegendre120Nodes) / sizeof(double) == "
        "kGaussLegendre120Pairs);\n"
        "static_assert(sizeof(kGaussLegendre120Weights) / sizeof(double) == "
        "kGaussLegendre120Pairs);\n\n"
        "}  // namespace kelstat\n\n"
        "#endif  // KELSTAT_TOLERANCE_GAUSS_LEGENDRE_120_TABLE_H\n");
}
