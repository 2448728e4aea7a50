// Eigenvalues and eigenvectors of symmetric matrices.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <random>
#include <vector>

#include "matrix/allege.h"
#include "matrix/matrix_eigensystem.h"
#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_new.h"
#include "matrix_test_support.h"

namespace {

using kelstat_test::messageOf;
using vek::matrix_library::matrix;
using vek::matrix_library::mEigenSystemsIterator;
using Vector = std::vector<double>;

matrix<double> symmetricFrom(const matrix<double>& a) {
    matrix<double> s(a);
    for (int i = 0; i < a.rowCount(); ++i) {
        for (int j = 0; j < i; ++j) s(j, i) = s(i, j);
    }
    return s;
}

// Q diag(values) Q' with the Householder reflection Q = I - 2 u u' / u'u of a random u.
matrix<double> withEigenvalues(const Vector& values, std::mt19937_64& engine) {
    const int n = static_cast<int>(values.size());
    const matrix<double> u = kelstat_test::randomMatrix(n, 1, engine);
    double norm2 = 0.0;
    for (int i = 0; i < n; ++i) norm2 += u(i, 0) * u(i, 0);
    matrix<double> q(n, n, 0.0);
    for (int i = 0; i < n; ++i) {
        for (int j = 0; j < n; ++j)
            q(i, j) = (i == j ? 1.0 : 0.0) - 2.0 * u(i, 0) * u(j, 0) / norm2;
    }
    matrix<double> a(n, n, 0.0);
    for (int i = 0; i < n; ++i) {
        for (int j = 0; j < n; ++j) {
            for (int k = 0; k < n; ++k) a(i, j) += q(i, k) * values[k] * q(j, k);
        }
    }
    return symmetricFrom(a);
}

// Largest of |A v - lambda v| over all pairs and of |V'V - I|, relative to the largest |lambda|.
double worstResidual(const matrix<double>& a, const Vector& values, const matrix<double>& vectors) {
    const int n = a.rowCount();
    double scale = 1.0;
    for (double value : values) scale = std::max(scale, std::fabs(value));
    double worst = 0.0;
    for (int column = 0; column < n; ++column) {
        for (int i = 0; i < n; ++i) {
            double product = 0.0;
            for (int k = 0; k < n; ++k) product += a(i, k) * vectors(k, column);
            worst =
                std::max(worst, std::fabs(product - values[column] * vectors(i, column)) / scale);
        }
        for (int other = 0; other < n; ++other) {
            double dot = 0.0;
            for (int k = 0; k < n; ++k) dot += vectors(k, column) * vectors(k, other);
            worst = std::max(worst, std::fabs(dot - (column == other ? 1.0 : 0.0)));
        }
    }
    return worst;
}

TEST(MatrixEigenSystem, SmallCasesWithKnownAnswers) {
    Vector values;
    matrix<double> vectors;
    EXPECT_EQ(mEigenSystemsIterator(matrix<double>(1, 1, -2.5), values, vectors), 0);
    EXPECT_EQ(values, Vector{-2.5});
    EXPECT_EQ(vectors(0, 0), 1.0);

    const matrix<double> pair(Vector{2, 1, 1, 2}, 2);
    ASSERT_EQ(pair.EigenSystems(values, vectors), 0);
    EXPECT_NEAR(values[0], 1.0, 1e-15);
    EXPECT_NEAR(values[1], 3.0, 1e-15);
    const double half = std::sqrt(0.5);
    EXPECT_NEAR(std::fabs(vectors(0, 0)), half, 1e-15);
    EXPECT_NEAR(vectors(0, 0) + vectors(1, 0), 0.0, 1e-15);
    EXPECT_NEAR(vectors(0, 1) - vectors(1, 1), 0.0, 1e-15);

    // Legendre Jacobi matrix of order 2.
    matrix<double> jacobi(2, 2, 0.0);
    jacobi(1, 0) = 1.0 / std::sqrt(3.0);
    ASSERT_EQ(mEigenSystemsIterator(jacobi, values, vectors), 0);
    EXPECT_NEAR(values[0], -1.0 / std::sqrt(3.0), 4e-16);
    EXPECT_NEAR(values[1], 1.0 / std::sqrt(3.0), 4e-16);

    EXPECT_EQ(mEigenSystemsIterator(matrix<double>(), values, vectors), 0);
    EXPECT_TRUE(values.empty());
    EXPECT_TRUE(vectors.empty());
}

TEST(MatrixEigenSystem, DiagonalMatrixIsSortedWithUnitColumns) {
    const Vector diagonal{3.0, -1.0, 7.0, 0.0, 2.0};
    matrix<double> a(5, 5, 0.0);
    for (int i = 0; i < 5; ++i) a(i, i) = diagonal[i];
    Vector values;
    matrix<double> vectors;
    ASSERT_EQ(mEigenSystemsIterator(a, values, vectors), 0);
    EXPECT_EQ(values, (Vector{-1.0, 0.0, 2.0, 3.0, 7.0}));
    const int source[] = {1, 3, 4, 0, 2};
    for (int column = 0; column < 5; ++column) {
        for (int row = 0; row < 5; ++row) {
            EXPECT_EQ(vectors(row, column), row == source[column] ? 1.0 : 0.0);
        }
    }
}

TEST(MatrixEigenSystem, ValuesEqualWithinTheFuzzKeepTheirOrder) {
    const double nearlyOne = 1.0 + 5e-13;
    matrix<double> a(3, 3, 0.0);
    a(0, 0) = nearlyOne;
    a(1, 1) = 1.0;
    a(2, 2) = 3.0;
    Vector values;
    matrix<double> vectors;
    ASSERT_EQ(mEigenSystemsIterator(a, values, vectors), 0);
    EXPECT_EQ(values, (Vector{nearlyOne, 1.0, 3.0}));
    EXPECT_EQ(vectors(0, 0), 1.0);
    EXPECT_EQ(vectors(1, 1), 1.0);
}

TEST(MatrixEigenSystem, UpperTriangleIsNotRead) {
    std::mt19937_64 engine(7);
    const matrix<double> a = symmetricFrom(kelstat_test::randomMatrix(6, 6, engine));
    matrix<double> scribbled(a);
    for (int i = 0; i < 6; ++i) {
        for (int j = i + 1; j < 6; ++j) scribbled(i, j) = 100.0 + i - j;
    }
    Vector values;
    Vector scribbledValues;
    matrix<double> vectors;
    matrix<double> scribbledVectors;
    ASSERT_EQ(mEigenSystemsIterator(a, values, vectors), 0);
    ASSERT_EQ(mEigenSystemsIterator(scribbled, scribbledValues, scribbledVectors), 0);
    EXPECT_EQ(values, scribbledValues);
    Vector flat;
    Vector scribbledFlat;
    vectors.mFlattenMatrix(flat, 0, true);
    scribbledVectors.mFlattenMatrix(scribbledFlat, 0, true);
    EXPECT_EQ(flat, scribbledFlat);
}

TEST(MatrixEigenSystem, RandomSymmetricMatrices) {
    std::mt19937_64 engine(42);
    for (int order : {2, 3, 4, 7, 10, 25, 60}) {
        const matrix<double> a = symmetricFrom(kelstat_test::randomMatrix(order, order, engine));
        Vector values;
        matrix<double> vectors;
        ASSERT_EQ(vek::matrix_library::EigenSystems(a, values, vectors), 0) << order;
        EXPECT_TRUE(std::is_sorted(values.begin(), values.end())) << order;
        EXPECT_LE(worstResidual(a, values, vectors), 1e-13 * order) << order;
        double trace = 0.0;
        double sum = 0.0;
        for (int i = 0; i < order; ++i) {
            trace += a(i, i);
            sum += values[i];
        }
        EXPECT_NEAR(trace, sum, 1e-13 * order);
    }
}

TEST(MatrixEigenSystem, RepeatedEigenvalues) {
    std::mt19937_64 engine(99);
    const Vector expected{-2.0, 1.0, 1.0, 1.0, 4.0, 4.0};
    for (int trial = 0; trial < 5; ++trial) {
        Vector shuffled(expected);
        std::shuffle(shuffled.begin(), shuffled.end(), engine);
        const matrix<double> a = withEigenvalues(shuffled, engine);
        Vector values;
        matrix<double> vectors;
        ASSERT_EQ(mEigenSystemsIterator(a, values, vectors), 0);
        for (std::size_t i = 0; i < expected.size(); ++i)
            EXPECT_NEAR(values[i], expected[i], 1e-14);
        EXPECT_LE(worstResidual(a, values, vectors), 1e-14);
    }
}

TEST(MatrixEigenSystem, AliasingAndShapeErrors) {
    matrix<double> a(Vector{2, 1, 1, 2}, 2);
    Vector values;
    ASSERT_EQ(a.EigenSystems(values, a), 0);  // the input may also receive the vectors
    EXPECT_NEAR(values[1], 3.0, 1e-15);
    EXPECT_NEAR(std::fabs(a(1, 1)), std::sqrt(0.5), 1e-15);

    const matrix<double> wide(2, 3, 1.0);
    EXPECT_EQ(messageOf<vek::allege::AllegeException>(
                  [&] { vek::matrix_library::EigenSystems(wide, values, a); }),
              "assertion failed: (iNumRows == lhs.colCount()) src/matrix/matrix_functions: 2025");
    EXPECT_EQ(messageOf<vek::matrix_library::MatrixException>(
                  [&] { mEigenSystemsIterator(wide.transpose(), values, a); }),
              "mEigenSystemsIterator: matrix must be square");
}

TEST(MatrixEigenSystem, NonFiniteInputEndsWithinTheIterationLimit) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const double inf = std::numeric_limits<double>::infinity();
    for (double bad : {nan, inf, -inf}) {
        matrix<double> a = symmetricFrom(matrix<double>(Vector{1, 0, 0, 2, 3, 0, 4, 5, 6}, 3));
        a(2, 1) = bad;
        Vector values;
        matrix<double> vectors;
        const int result = mEigenSystemsIterator(a, values, vectors);
        EXPECT_GE(result, 0);
        EXPECT_LE(result, 3);
        EXPECT_EQ(values.size(), 3u);
        EXPECT_EQ(vectors.rowCount(), 3);
    }
}

}  // namespace
