// Gauss-Legendre quadrature: symmetric rules on (-1, 1) and their application to a function.
#ifndef KELSTAT_NUMERICS_GAUSS_LEGENDRE_H
#define KELSTAT_NUMERICS_GAUSS_LEGENDRE_H

#include <vector>

namespace kelstat {

class ZRXRealFunction;

// Largest order findGaussianQuadratureWeights builds: its work grows as n^3 (about 10 s at this
// order) and no caller needs more than a few hundred points.
inline constexpr unsigned kMaxGaussLegendreOrder = 1024;

// Appends the n/2 symmetric pairs of the n-point Gauss-Legendre rule: to nodes the negative node
// of each pair, most negative first, and to weights the pair's common weight. Odd n loses its
// middle node at 0. Nodes are the eigenvalues and weights 2 v0^2 from the first components of the
// unit eigenvectors of the Jacobi matrix of the Legendre polynomials (Golub and Welsch, Math. Comp.
// 23, 1969). Nodes are good to about 1e-15 absolute, weights to about 1e-13 relative (the
// smallest end weights of large rules to a few units of 1e-15 absolute). Returns false and appends
// nothing when the eigen-system iteration fails, or when n is below 2 or above
// kMaxGaussLegendreOrder.
bool findGaussianQuadratureWeights(unsigned n, std::vector<double>& nodes,
                                   std::vector<double>& weights);

// Applies a symmetric rule to f on [a, b]: half * sum of w (f(mid + t) + f(mid - t)) with
// t = node * half, pairs in list order and f(mid + t) evaluated first. Exactly two evaluations per
// pair; an empty rule gives 0, a > b the negated integral. Extra entries of the longer list are
// ignored. NaN or infinite values of f propagate.
double calcGaussianIntegration(double a, double b, const std::vector<double>& nodes,
                               const std::vector<double>& weights, ZRXRealFunction& f);

// Builds the n-point rule (the built-in 16-point table for n = 16) and applies it. A rule that
// cannot be built gives 0.
double calcGaussianIntegration(double a, double b, ZRXRealFunction& f, unsigned n);

}  // namespace kelstat

#endif  // KELSTAT_NUMERICS_GAUSS_LEGENDRE_H
