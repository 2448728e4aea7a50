// Helpers shared by the matrix tests.
#ifndef KELSTAT_TESTS_MATRIX_MATRIX_TEST_SUPPORT_H
#define KELSTAT_TESTS_MATRIX_MATRIX_TEST_SUPPORT_H

#include <exception>
#include <functional>
#include <random>
#include <string>

#include "matrix/matrix_new.h"

namespace kelstat_test {

// The text of the exception of type E that action throws, or a note saying what happened instead.
template <class E>
std::string messageOf(const std::function<void()>& action) {
    try {
        action();
    } catch (const E& caught) {
        return caught.what();
    } catch (const std::exception& other) {
        return std::string("<other exception: ") + other.what() + ">";
    }
    return "<no exception>";
}

// A dense rows x cols matrix of uniform deviates on [-1, 1).
inline vek::matrix_library::matrix<double> randomMatrix(int rows, int cols,
                                                        std::mt19937_64& engine) {
    std::uniform_real_distribution<double> uniform(-1.0, 1.0);
    vek::matrix_library::matrix<double> a(rows, cols);
    for (int i = 0; i < rows; ++i) {
        for (int j = 0; j < cols; ++j) a(i, j) = uniform(engine);
    }
    return a;
}

// B'B + n I for a random B: symmetric and comfortably positive definite.
inline vek::matrix_library::Smatrix<double> randomPositiveDefinite(int n, std::mt19937_64& engine) {
    const vek::matrix_library::matrix<double> b = randomMatrix(n, n, engine);
    vek::matrix_library::Smatrix<double> a(n);
    for (int i = 0; i < n; ++i) {
        for (int j = 0; j <= i; ++j) {
            double sum = i == j ? n : 0.0;
            for (int k = 0; k < n; ++k) sum += b(k, i) * b(k, j);
            a(i, j) = sum;
        }
    }
    return a;
}

}  // namespace kelstat_test

#endif  // KELSTAT_TESTS_MATRIX_MATRIX_TEST_SUPPORT_H
