// Second half of the smallest-extreme-value K-factor references: solves the 120-point K-factor
// equation in high precision for every line written by tests/gen/sev_integration_ranges.cpp and
// writes tests/data/sev_kfactor_reference.csv.
//
// For a sample of standardized residuals a_i (tests/tolerance/sev_reference_samples.h) and the
// library's integration range [lower, upper], with z_j the 120 points mid +/- half x node_j of
// the exact Gauss-Legendre rule, S(z) = mean of exp(a_i z), c = sum of a_i, and
//   ln g(z) = c (z - 1) + n ln(z / S(z)) - 2 ln z   (n >= 3),   c (z - 1) - 2 ln S(z)   (n = 2),
// the root x of
//   sum_j w_j g(z_j) P(Gamma(n, 1) <= -ln(p) exp(-x z_j) n S(z_j)) / sum_j w_j g(z_j) = 1 - alpha
// is found by regula falsi (Illinois) to 1e-32 and reported as K = sign x. Everything runs in
// 50-digit binary floating point (boost::multiprecision::cpp_bin_float_50), above 5000
// observations in 113-bit (cpp_bin_float_quad) to keep a million exponentials per point
// affordable; ln g keeps every value finite. The gamma distribution function is
// boost::math::gamma_p at the same precision. 30 significant digits are written.
//
// Build and run from the repository root:
//   g++ -std=c++17 -O2 -Itests/tolerance tests/gen/sev_kfactor_reference.cpp -o /tmp/sev_ref
//   /tmp/sev_ref < /tmp/sev_ranges.txt > tests/data/sev_kfactor_reference.csv
#include <boost/math/constants/constants.hpp>
#include <boost/math/policies/policy.hpp>
#include <boost/math/special_functions/gamma.hpp>
#include <boost/multiprecision/cpp_bin_float.hpp>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <iomanip>
#include <iostream>
#include <limits>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "sev_reference_samples.h"

namespace {

using Quiet = boost::math::policies::policy<
    boost::math::policies::domain_error<boost::math::policies::ignore_error>,
    boost::math::policies::overflow_error<boost::math::policies::ignore_error>,
    boost::math::policies::evaluation_error<boost::math::policies::ignore_error>>;

template <class Real>
std::pair<Real, Real> legendre(int n, const Real& x) {
    Real lower = 1;
    Real value = x;
    for (int degree = 2; degree <= n; ++degree) {
        Real next = ((2 * degree - 1) * x * value - (degree - 1) * lower) / degree;
        lower = value;
        value = next;
    }
    return {value, n * (x * value - lower) / (x * x - 1)};
}

template <class Real>
void exactRule(std::vector<Real>& nodes, std::vector<Real>& weights) {
    constexpr int kOrder = 120;
    const Real pi = boost::math::constants::pi<Real>();
    const Real limit = std::numeric_limits<Real>::epsilon() * 16;
    for (int i = kOrder / 2 + 1; i <= kOrder; ++i) {
        Real x = -cos(pi * (i - Real(0.25)) / (kOrder + Real(0.5)));
        for (int iteration = 0; iteration < 200; ++iteration) {
            const Real step = legendre(kOrder, x).first / legendre(kOrder, x).second;
            x -= step;
            if (abs(step) < limit) break;
        }
        const Real derivative = legendre(kOrder, x).second;
        nodes.push_back(x);
        weights.push_back(2 / ((1 - x * x) * derivative * derivative));
    }
}

template <class Real>
struct Equation {
    Real n;
    Real alpha;
    Real minusLogProportion;
    std::vector<Real> points;
    std::vector<Real> weights;  // rule weight times g / integral of g, per point
    std::vector<Real> scaledMeans;

    Real operator()(const Real& x) const {
        Real sum = 0;
        for (std::size_t j = 0; j < points.size(); ++j) {
            const Real argument = minusLogProportion * exp(-x * points[j]) * scaledMeans[j];
            sum += weights[j] * boost::math::gamma_p(n, argument, Quiet());
        }
        return sum - 1 + alpha;
    }
};

template <class Real>
Equation<Real> buildEquation(const std::vector<double>& sample, double alpha, double proportion,
                             double lower, double upper) {
    std::vector<Real> nodes;
    std::vector<Real> ruleWeights;
    exactRule(nodes, ruleWeights);
    std::vector<Real> residuals(sample.begin(), sample.end());
    Equation<Real> equation;
    const std::size_t count = sample.size();
    equation.n = Real(count);
    equation.alpha = Real(alpha);
    equation.minusLogProportion = -log(Real(proportion));
    Real sumOfResiduals = 0;
    for (const Real& residual : residuals) sumOfResiduals += residual;
    const Real half = (Real(upper) - Real(lower)) / 2;
    const Real mid = (Real(lower) + Real(upper)) / 2;
    Real integral = 0;
    for (std::size_t j = 0; j < nodes.size(); ++j) {
        for (int side : {1, -1}) {
            const Real z = mid + side * half * nodes[j];
            Real mean = 0;
            for (const Real& residual : residuals) mean += exp(residual * z);
            mean /= equation.n;
            Real logDensity;
            if (count >= 3) {
                logDensity =
                    z > 0 ? sumOfResiduals * (z - 1) + equation.n * log(z / mean) - 2 * log(z)
                          : Real(0);
            } else {
                logDensity = sumOfResiduals * (z - 1) - 2 * log(mean);
            }
            const Real density = (count >= 3 && !(z > 0)) ? Real(0) : exp(logDensity);
            equation.points.push_back(z);
            equation.scaledMeans.push_back(equation.n * mean);
            equation.weights.push_back(ruleWeights[j] * density);
            integral += ruleWeights[j] * density;
        }
    }
    for (Real& weight : equation.weights) weight /= integral;
    return equation;
}

template <class Real>
Real solve(const Equation<Real>& equation, double hint) {
    // Bracket around the library's root, widening until F changes sign.
    Real width = 1e-6 * (1 + std::abs(hint));
    Real low = Real(hint) - width;
    Real high = Real(hint) + width;
    Real lowValue = equation(low);
    Real highValue = equation(high);
    for (int widen = 0; widen < 200 && lowValue * highValue > 0; ++widen) {
        width *= 4;
        low = Real(hint) - width;
        high = Real(hint) + width;
        lowValue = equation(low);
        highValue = equation(high);
    }
    if (lowValue * highValue > 0) return std::numeric_limits<Real>::quiet_NaN();
    int lastSide = 0;
    const Real tolerance = Real("1e-32") * (1 + abs(Real(hint)));
    for (int iteration = 0; iteration < 500 && high - low > tolerance; ++iteration) {
        const Real x = high - highValue * (high - low) / (highValue - lowValue);
        const Real value = equation(x);
        if (value == 0) return x;
        if ((value > 0) == (lowValue > 0)) {
            low = x;
            lowValue = value;
            if (lastSide == -1) highValue /= 2;
            lastSide = -1;
        } else {
            high = x;
            highValue = value;
            if (lastSide == 1) lowValue /= 2;
            lastSide = 1;
        }
        if (abs(value) < Real("1e-45")) return x;
    }
    return (low + high) / 2;
}

template <class Real>
std::string kFactor(const std::vector<double>& sample, double alpha, double proportion, int sign,
                    double lower, double upper, double hint) {
    const Equation<Real> equation = buildEquation<Real>(sample, alpha, proportion, lower, upper);
    const Real root = solve(equation, sign * hint);
    std::ostringstream out;
    out << std::setprecision(30) << std::scientific << Real(sign * root);
    return out.str();
}

}  // namespace

int main() {
    std::printf(
        "# Smallest-extreme-value K-factors of the 120-point equation on fixed residual samples\n"
        "# (tests/tolerance/sev_reference_samples.h), solved in 50-digit (113-bit above 5000\n"
        "# observations) arithmetic by tests/gen/sev_kfactor_reference.cpp over the integration\n"
        "# range the library uses (lower, upper as exact hexadecimal doubles; logarithmic 1 where\n"
        "# the direct form of g is not finite). k = sign x root, 30 significant digits.\n"
        "sample,n,alpha,proportion,sign,lower,upper,logarithmic,k\n");
    std::string line;
    while (std::getline(std::cin, line)) {
        std::stringstream fields(line);
        std::vector<std::string> parts;
        std::string part;
        while (std::getline(fields, part, ',')) parts.push_back(part);
        if (parts.size() != 9) continue;
        const std::vector<double> sample = kelstat::testing::sevReferenceSample(parts[0]);
        const double alpha = std::strtod(parts[2].c_str(), nullptr);
        const double proportion = std::strtod(parts[3].c_str(), nullptr);
        const int sign = std::atoi(parts[4].c_str());
        const double lower = std::strtod(parts[5].c_str(), nullptr);
        const double upper = std::strtod(parts[6].c_str(), nullptr);
        const double hint = std::strtod(parts[8].c_str(), nullptr);
        const std::string k = sample.size() > 5000
                                  ? kFactor<boost::multiprecision::cpp_bin_float_quad>(
                                        sample, alpha, proportion, sign, lower, upper, hint)
                                  : kFactor<boost::multiprecision::cpp_bin_float_50>(
                                        sample, alpha, proportion, sign, lower, upper, hint);
        std::printf("%s,%s,%s,%s,%s,%s,%s,%s,%s\n", parts[0].c_str(), parts[1].c_str(),
                    parts[2].c_str(), parts[3].c_str(), parts[4].c_str(), parts[5].c_str(),
                    parts[6].c_str(), parts[7].c_str(), k.c_str());
        std::fflush(stdout);
    }
}
