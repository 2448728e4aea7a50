// Cholesky factor, solve and inverse on packed storage.
#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <vector>

#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_functions.h"
#include "matrix/matrix_new.h"
#include "matrix_test_support.h"

namespace {

using kelstat_test::messageOf;
using kelstat_test::randomPositiveDefinite;
using vek::matrix_library::CholeskyBackSub;
using vek::matrix_library::CholeskyDecomp;
using vek::matrix_library::CholeskyDecompWithThrow;
using vek::matrix_library::MatrixException;
using vek::matrix_library::MatrixSingular;
using vek::matrix_library::Smatrix;
using vek::matrix_library::SmatrixToUTmatrix;
using vek::matrix_library::UTmatrix;
using Vector = std::vector<double>;

Smatrix<double> symmetric(int order, const Vector& lowerByRows) {
    Smatrix<double> s(order);
    std::size_t next = 0;
    for (int i = 0; i < order; ++i) {
        for (int j = 0; j <= i; ++j) s(i, j) = lowerByRows[next++];
    }
    return s;
}

TEST(MatrixCholesky, HandCheckedTwoByTwo) {
    const Smatrix<double> a = symmetric(2, {4, 2, 3});
    UTmatrix<double> r;
    ASSERT_TRUE(CholeskyDecomp(a, &r));
    EXPECT_EQ(r(0, 0), 2.0);
    EXPECT_EQ(r(0, 1), 1.0);
    EXPECT_EQ(r(1, 1), std::sqrt(2.0));
    EXPECT_EQ(r(1, 0), 0.0);

    const Vector x = CholeskyBackSub(r, {2, 1});
    EXPECT_NEAR(x[0], 0.5, 1e-16);
    EXPECT_NEAR(x[1], 0.0, 1e-16);

    const Smatrix<double> inverse = r.CholeskyInverse();
    EXPECT_NEAR(inverse(0, 0), 0.375, 1e-16);
    EXPECT_NEAR(inverse(0, 1), -0.25, 1e-16);
    EXPECT_NEAR(inverse(1, 1), 0.5, 2e-16);
}

TEST(MatrixCholesky, FailureReportsColumnAndPivot) {
    struct Case {
        Smatrix<double> a;
        int failIndex;
        double pivot;
    };
    const Case cases[] = {
        {symmetric(2, {1, 2, 1}), 1, 3.0},
        {symmetric(3, {0, 0, 0, 0, 0, 0}), 0, 0.0},
        {symmetric(3, {4, 2, 3, 1, 1, -5}), 2, 5.0 + 1.0 / 4.0 + 0.25 / 2.0},
    };
    for (const Case& c : cases) {
        int failIndex = 99;
        double pivot = -1.0;
        CholeskyDecomp(SmatrixToUTmatrix(c.a), 0, &failIndex, &pivot);
        EXPECT_EQ(failIndex, c.failIndex);
        EXPECT_NEAR(pivot, c.pivot, 1e-15);

        UTmatrix<double> r(2, 1.0);
        EXPECT_FALSE(c.a.CholeskyDecomp(&r));
        EXPECT_TRUE(r.isEmpty());
        Smatrix<double> inverse(2, 1.0);
        EXPECT_FALSE(vek::matrix_library::inverse(c.a, &inverse));
        EXPECT_TRUE(inverse.isEmpty());
        EXPECT_EQ(messageOf<MatrixSingular>([&] { CholeskyDecompWithThrow(c.a); }),
                  "Matrix is singular");
        EXPECT_EQ(messageOf<MatrixSingular>([&] { inverseWithThrow(c.a); }), "Matrix is singular");
    }
}

TEST(MatrixCholesky, StartRowAndEmptyMatrices) {
    int failIndex = 5;
    double pivot = 0.0;
    const UTmatrix<double> empty;
    EXPECT_TRUE(CholeskyDecomp(empty, 0, &failIndex, &pivot).isEmpty());
    EXPECT_EQ(failIndex, -1);
    EXPECT_TRUE(CholeskyBackSub(empty, {}).empty());

    const UTmatrix<double> u(2, Vector{4, 2, 3});
    failIndex = 5;
    const UTmatrix<double> unchanged = u.CholeskyDecomp(2, &failIndex, &pivot);
    EXPECT_EQ(failIndex, -1);
    EXPECT_EQ(unchanged(0, 1), 2.0);
    EXPECT_EQ(messageOf<MatrixException>([&] { u.CholeskyDecomp(3, &failIndex, &pivot); }),
              "UTmatrix: starting row greater than dimension");
    EXPECT_EQ(messageOf<MatrixException>([&] { CholeskyBackSub(u, {1.0}); }),
              "UTmatrix: matrix and vector have incompatible dimensions");
}

TEST(MatrixCholesky, RestartTakesEarlierRowsAsFactored) {
    // Rows (4 2 2), (2 3 1), (2 1 6): R has rows (2 1 1), (0 sqrt2 0), (0 0 sqrt5).
    const Smatrix<double> a = symmetric(3, {4, 2, 3, 2, 1, 6});
    UTmatrix<double> full;
    ASSERT_TRUE(CholeskyDecomp(a, &full));
    EXPECT_NEAR(full(2, 2), std::sqrt(5.0), 1e-15);

    // The leading block's factor, grown by a column whose upper part is already solved.
    UTmatrix<double> leading;
    ASSERT_TRUE(CholeskyDecomp(symmetric(2, {4, 2, 3}), &leading));
    UTmatrix<double> grown(3);
    for (int i = 0; i < 2; ++i) {
        for (int j = i; j < 2; ++j) grown(i, j) = leading(i, j);
    }
    grown(0, 2) = full(0, 2);
    grown(1, 2) = full(1, 2);
    grown(2, 2) = a(2, 2);
    int failIndex = 0;
    double pivot = 0.0;
    const UTmatrix<double> extended = CholeskyDecomp(grown, 2, &failIndex, &pivot);
    EXPECT_EQ(failIndex, -1);
    EXPECT_EQ(pivot, 5.0);  // the last squared diagonal
    for (int i = 0; i < 3; ++i) {
        for (int j = i; j < 3; ++j) EXPECT_EQ(extended(i, j), full(i, j)) << i << ", " << j;
    }

    // A ridge on a failed column: restarting there reuses the column's solved upper part.
    UTmatrix<double> failed =
        CholeskyDecomp(SmatrixToUTmatrix(symmetric(2, {1, 2, 1})), 0, &failIndex, &pivot);
    ASSERT_EQ(failIndex, 1);
    failed(1, 1) += pivot + 1.0;
    const UTmatrix<double> repaired = CholeskyDecomp(failed, 1, &failIndex, &pivot);
    EXPECT_EQ(failIndex, -1);
    EXPECT_EQ(repaired(0, 1), 2.0);
    EXPECT_EQ(repaired(1, 1), 1.0);
}

TEST(MatrixCholesky, RandomPositiveDefiniteInverseAndSolve) {
    std::mt19937_64 engine(20241123);
    for (int order : {1, 2, 3, 5, 8, 13, 30}) {
        const Smatrix<double> a = randomPositiveDefinite(order, engine);
        const UTmatrix<double> r = CholeskyDecompWithThrow(a);
        // R'R reproduces A.
        for (int i = 0; i < order; ++i) {
            for (int j = 0; j <= i; ++j) {
                double product = 0.0;
                for (int k = 0; k < order; ++k) product += r(k, i) * r(k, j);
                EXPECT_NEAR(product, a(i, j), 1e-12 * order) << order;
            }
        }
        const Smatrix<double> inverse = inverseWithThrow(a);
        double worst = 0.0;
        for (int i = 0; i < order; ++i) {
            for (int j = 0; j < order; ++j) {
                double product = 0.0;
                for (int k = 0; k < order; ++k) product += a(i, k) * inverse(k, j);
                worst = std::max(worst, std::fabs(product - (i == j ? 1.0 : 0.0)));
            }
        }
        EXPECT_LE(worst, 1e-12) << "order " << order;

        Vector b(static_cast<std::size_t>(order));
        for (int i = 0; i < order; ++i) b[static_cast<std::size_t>(i)] = i - 0.5 * order;
        const Vector x = r.CholeskyBackSub(b);
        for (int i = 0; i < order; ++i) {
            double residual = -b[static_cast<std::size_t>(i)];
            for (int k = 0; k < order; ++k) residual += a(i, k) * x[static_cast<std::size_t>(k)];
            EXPECT_NEAR(residual, 0.0, 1e-12 * order) << order;
        }
    }
}

TEST(MatrixCholesky, ColumnPrimitivesCheckTheirCounts) {
    Smatrix<double> s = symmetric(2, {1, 2, 3});
    vek::matrix_library::KTimesColumn(s, 2.0, 1, 2);
    EXPECT_EQ(s(0, 1), 4.0);
    EXPECT_EQ(s(1, 1), 6.0);
    vek::matrix_library::KTimesColumnPlusColumn(s, 0.5, 1, 0, 1);
    EXPECT_EQ(s(0, 0), 3.0);
    Vector v{1.0, 1.0};
    const UTmatrix<double> u(2, Vector{1, 2, 3});
    vek::matrix_library::KTimesColumnPlusVector(u, 2.0, 1, v, 2);
    EXPECT_EQ(v, (Vector{5.0, 7.0}));
    const vek::matrix_library::matrix<double> dense(u);
    vek::matrix_library::KTimesColumnPlusVector(dense, -1.0, 0, v, 2);
    EXPECT_EQ(v, (Vector{4.0, 7.0}));

    const char* tooMany = "matrix::number of products greater than dimension";
    EXPECT_EQ(messageOf<MatrixException>([&] { KTimesColumn(s, 1.0, 0, 3); }), tooMany);
    EXPECT_EQ(messageOf<MatrixException>([&] { KTimesColumnPlusColumn(s, 1.0, 0, 1, 3); }),
              tooMany);
    EXPECT_EQ(messageOf<MatrixException>([&] { KTimesColumnPlusVector(u, 1.0, 0, v, 3); }),
              tooMany);
}

}  // namespace
