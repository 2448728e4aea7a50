// Writes the reference Gauss-Legendre rules used by tests/numerics/test_gauss_legendre.cpp.
//
// Nodes are the zeros of P_n found by Newton's method in 50-digit binary floating point
// (boost::multiprecision::cpp_bin_float_50) from the starting values cos(pi (i - 1/4) / (n + 1/2));
// P_n and P_n' come from the three-term recurrence. Weights are 2 / ((1 - x^2) P_n'(x)^2).
// Iteration stops when a step falls below 1e-45, so the 34 digits written are exact.
//
// Build and run from the repository root:
//   g++ -std=c++17 -O2 tests/gen/gauss_legendre_reference.cpp -o /tmp/gauss_legendre_reference
//   /tmp/gauss_legendre_reference > tests/data/gauss_legendre_rules.csv
#include <boost/math/constants/constants.hpp>
#include <boost/multiprecision/cpp_bin_float.hpp>
#include <iomanip>
#include <iostream>
#include <utility>

using Real = boost::multiprecision::cpp_bin_float_50;

namespace {

// P_n(x) and P_n'(x).
std::pair<Real, Real> legendre(int n, const Real& x) {
    Real previous = 1;
    Real current = x;
    for (int k = 2; k <= n; ++k) {
        Real next = ((2 * k - 1) * x * current - (k - 1) * previous) / k;
        previous = current;
        current = next;
    }
    const Real derivative = n * (x * current - previous) / (x * x - 1);
    return {current, derivative};
}

void writeRule(int n) {
    const Real pi = boost::math::constants::pi<Real>();
    const Real tolerance("1e-45");
    // Negative nodes, most negative first, as the library lists them.
    for (int i = 1; i <= n / 2; ++i) {
        Real x = -cos(pi * (i - Real(0.25)) / (n + Real(0.5)));
        for (int iteration = 0; iteration < 100; ++iteration) {
            const auto [value, derivative] = legendre(n, x);
            const Real step = value / derivative;
            x -= step;
            if (abs(step) < tolerance) break;
        }
        const Real derivative = legendre(n, x).second;
        const Real weight = 2 / ((1 - x * x) * derivative * derivative);
        std::cout << n << ',' << i - 1 << ',' << std::setprecision(34) << std::scientific << x
                  << ',' << weight << '\n';
    }
}

}  // namespace

int main() {
    std::cout << "# Gauss-Legendre rules: order n, pair index k (0 = most negative node), node, weight.\n"
                 "# Newton's method on P_n in 50-digit arithmetic (tests/gen/gauss_legendre_reference.cpp);\n"
                 "# 34 significant digits, all exact.\n"
                 "n,k,node,weight\n";
    for (int n : {2, 5, 16, 36, 120}) writeRule(n);
}
