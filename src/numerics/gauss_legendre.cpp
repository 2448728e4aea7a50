#include "numerics/gauss_legendre.h"

#include <cmath>
#include <cstddef>

#include "matrix/matrix_eigensystem.h"
#include "matrix/matrix_new.h"
#include "numerics/real_function.h"

namespace kelstat {

namespace {

// The library's 16-point rule: the Gauss-Legendre positive nodes, ascending, to 12 decimals, and
// their weights to 15 (two not correctly rounded in the last decimal). These decimals are the
// rule itself; its weights sum to 1 within about 1e-15, not exactly.
constexpr std::size_t kTablePairs = 8;
constexpr double kTableNodes[kTablePairs] = {
    0.095012509838, 0.281603550779, 0.458016777657, 0.617876244403,
    0.755404408355, 0.865631202388, 0.944575023073, 0.989400934992,
};
constexpr double kTableWeights[kTablePairs] = {
    0.189450610455069, 0.182603415044924, 0.169156519395003, 0.149595988816577,
    0.124628971255534, 0.095158511682492, 0.062253523938648, 0.027152459411754,
};
constexpr unsigned kTableOrder = 16;

// Integral of the Legendre weight function 1 over (-1, 1): the weights' common factor.
constexpr double kWeightTotal = 2.0;

}  // namespace

bool findGaussianQuadratureWeights(unsigned n, std::vector<double>& nodes,
                                   std::vector<double>& weights) {
    if (n < 2 || n > kMaxGaussLegendreOrder) return false;
    const int order = static_cast<int>(n);

    // Symmetric tridiagonal Jacobi matrix, zero diagonal, lower triangle only:
    // beta_k = k / sqrt(4 k^2 - 1), written as 0.5 / sqrt(1 - 1 / (4 k^2)).
    vek::matrix_library::matrix<double> jacobi(order, order, 0.0);
    double k = 0.0;
    for (int row = 1; row < order; ++row) {
        k += 1.0;
        jacobi(row, row - 1) = 0.5 / std::sqrt(1.0 + 1.0 / (-4.0 * k * k));
    }

    std::vector<double> values;
    vek::matrix_library::matrix<double> vectors;
    if (vek::matrix_library::mEigenSystemsIterator(jacobi, values, vectors) != 0) return false;

    // Ascending eigenvalues: the first n/2 are the negative nodes.
    for (int pair = 0; pair < order / 2; ++pair) {
        const double firstComponent = vectors(0, pair);
        nodes.push_back(values[static_cast<std::size_t>(pair)]);
        weights.push_back(kWeightTotal * (firstComponent * firstComponent));
    }
    return true;
}

double calcGaussianIntegration(double a, double b, const std::vector<double>& nodes,
                               const std::vector<double>& weights, ZRXRealFunction& f) {
    const double half = 0.5 * (b - a);
    const double mid = 0.5 * (a + b);
    const std::size_t pairs = nodes.size() < weights.size() ? nodes.size() : weights.size();
    double sum = 0.0;
    for (std::size_t pair = 0; pair < pairs; ++pair) {
        const double offset = nodes[pair] * half;
        const double right = f(mid + offset);
        const double left = f(mid - offset);
        sum = sum + weights[pair] * (right + left);
    }
    return half * sum;
}

double calcGaussianIntegration(double a, double b, ZRXRealFunction& f, unsigned n) {
    std::vector<double> nodes;
    std::vector<double> weights;
    if (n == kTableOrder) {
        nodes.assign(kTableNodes, kTableNodes + kTablePairs);
        weights.assign(kTableWeights, kTableWeights + kTablePairs);
    } else {
        findGaussianQuadratureWeights(n, nodes, weights);
    }
    return calcGaussianIntegration(a, b, nodes, weights, f);
}

}  // namespace kelstat
