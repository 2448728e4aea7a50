// Random matrices of the four kinds and a plain dense reference product, shared by the tests of
// the arithmetic and of the lazy expressions.
#ifndef KELSTAT_TESTS_MATRIX_MATRIX_KINDS_SUPPORT_H
#define KELSTAT_TESTS_MATRIX_MATRIX_KINDS_SUPPORT_H

#include <cmath>
#include <random>
#include <type_traits>

#include "matrix/matrix_new.h"

namespace kelstat_test {

using Dense = vek::matrix_library::matrix<double>;
using Symmetric = vek::matrix_library::Smatrix<double>;
using Upper = vek::matrix_library::UTmatrix<double>;
using Diagonal = vek::matrix_library::Dmatrix<double>;

// A value for one stored element: uniform on [-1, 1), or an integer in [-9, 9] so that sums and
// products of moderate size are exact.
inline double randomElement(std::mt19937_64& engine, bool integerValued) {
    if (integerValued)
        return static_cast<double>(std::uniform_int_distribution<int>(-9, 9)(engine));
    return std::uniform_real_distribution<double>(-1.0, 1.0)(engine);
}

// A random matrix of kind K; the square kinds take `rows` as their order.
template <class K>
K randomOfKind(int rows, int cols, std::mt19937_64& engine, bool integerValued = false) {
    if constexpr (std::is_same_v<K, Dense>) {
        Dense a(rows, cols);
        for (int i = 0; i < rows; ++i) {
            for (int j = 0; j < cols; ++j) a(i, j) = randomElement(engine, integerValued);
        }
        return a;
    } else {
        K a(rows);
        for (int i = 0; i < rows; ++i) {
            for (int j = 0; j < rows; ++j) {
                const bool stored = std::is_same_v<K, Symmetric> ? j <= i
                                    : std::is_same_v<K, Upper>   ? j >= i
                                                                 : j == i;
                if (stored) a(i, j) = randomElement(engine, integerValued);
            }
        }
        return a;
    }
}

// The textbook product, summed over k in order.
inline Dense referenceProduct(const Dense& a, const Dense& b) {
    Dense r(a.rowCount(), b.colCount());
    for (int i = 0; i < a.rowCount(); ++i) {
        for (int j = 0; j < b.colCount(); ++j) {
            double sum = 0.0;
            for (int k = 0; k < a.colCount(); ++k) sum += a(i, k) * b(k, j);
            r(i, j) = sum;
        }
    }
    return r;
}

// Largest |r(i, j) - e(i, j)| / (sum over k of |a(i, k) b(k, j)|): the error of r as a product of
// a and b in units of the magnitude its rounding is bounded by. NaN when shapes differ.
inline double worstScaledError(const Dense& r, const Dense& a, const Dense& b) {
    const Dense e = referenceProduct(a, b);
    if (r.rowCount() != e.rowCount() || r.colCount() != e.colCount()) return NAN;
    double worst = 0.0;
    for (int i = 0; i < r.rowCount(); ++i) {
        for (int j = 0; j < r.colCount(); ++j) {
            double scale = 0.0;
            for (int k = 0; k < a.colCount(); ++k) scale += std::fabs(a(i, k) * b(k, j));
            const double difference = std::fabs(r(i, j) - e(i, j));
            if (difference != 0.0) worst = std::fmax(worst, difference / scale);
        }
    }
    return worst;
}

}  // namespace kelstat_test

#endif  // KELSTAT_TESTS_MATRIX_MATRIX_KINDS_SUPPORT_H
