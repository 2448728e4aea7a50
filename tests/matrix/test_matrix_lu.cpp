// LU decomposition: solutions and determinants against 50-digit elimination, pivot choice,
// singular and nearly singular matrices, and the checks of its interface.
#include <gtest/gtest.h>

#include <boost/multiprecision/cpp_bin_float.hpp>
#include <cmath>
#include <functional>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "matrix/allege.h"
#include "matrix/matrix_arithmetic.h"
#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_ludecomposition.h"
#include "matrix_kinds_support.h"
#include "matrix_test_support.h"

namespace {

using kelstat_test::Dense;
using kelstat_test::messageOf;
using kelstat_test::randomOfKind;
using vek::allege::AllegeException;
using vek::matrix_library::determinant;
using vek::matrix_library::determinantWithThrow;
using vek::matrix_library::inverse;
using vek::matrix_library::inverseWithThrow;
using vek::matrix_library::LUDecomposition;
using vek::matrix_library::LUDecompSafeIterator;
using vek::matrix_library::MatrixException;
using vek::matrix_library::MatrixSingular;
using Vector = std::vector<double>;
using Wide = boost::multiprecision::cpp_bin_float_50;

Dense fromRows(int order, const Vector& byRows) {
    return Dense(byRows, order);
}

// Determinant by Gaussian elimination with partial pivoting in 50 significant digits.
double wideDeterminant(const Dense& a) {
    const int n = a.rowCount();
    std::vector<std::vector<Wide>> m(n, std::vector<Wide>(n));
    for (int i = 0; i < n; ++i) {
        for (int j = 0; j < n; ++j) m[i][j] = a(i, j);
    }
    Wide result = 1;
    for (int j = 0; j < n; ++j) {
        int pivot = j;
        for (int i = j + 1; i < n; ++i) {
            if (abs(m[i][j]) > abs(m[pivot][j])) pivot = i;
        }
        if (m[pivot][j] == 0) return 0.0;
        if (pivot != j) {
            std::swap(m[pivot], m[j]);
            result = -result;
        }
        result *= m[j][j];
        for (int i = j + 1; i < n; ++i) {
            const Wide factor = m[i][j] / m[j][j];
            for (int k = j; k < n; ++k) m[i][k] -= factor * m[j][k];
        }
    }
    return static_cast<double>(result);
}

// max |A x - b| / (|A| |x| + |b|) in the infinity norms, with the residual summed in 50 digits.
double relativeResidual(const Dense& a, const Vector& x, const Vector& b) {
    double worstResidual = 0.0;
    double normA = 0.0;
    double normX = 0.0;
    double normB = 0.0;
    for (int i = 0; i < a.rowCount(); ++i) {
        Wide residual = -Wide(b[i]);
        double rowSum = 0.0;
        for (int k = 0; k < a.colCount(); ++k) {
            residual += Wide(a(i, k)) * x[k];
            rowSum += std::fabs(a(i, k));
        }
        worstResidual = std::fmax(worstResidual, std::fabs(static_cast<double>(residual)));
        normA = std::fmax(normA, rowSum);
        normX = std::fmax(normX, std::fabs(x[i]));
        normB = std::fmax(normB, std::fabs(b[i]));
    }
    return worstResidual / (normA * normX + normB);
}

TEST(MatrixLU, RandomSystemsSolveToRoundingAndDeterminantsMatch) {
    std::mt19937_64 engine(2026);
    for (int order : {1, 2, 3, 5, 8, 17, 40}) {
        const Dense a = randomOfKind<Dense>(order, order, engine);
        const Dense rhs = randomOfKind<Dense>(order, 3, engine);
        const LUDecomposition lu(a);
        ASSERT_FALSE(lu.isSingular()) << order;

        Dense solutions;
        ASSERT_TRUE(lu.Solve(rhs, &solutions));
        for (int column = 0; column < 3; ++column) {
            const Vector b = rhs.getColVector(column);
            Vector x;
            ASSERT_TRUE(lu.Solve(b, &x));
            EXPECT_LE(relativeResidual(a, x, b), 1e-12) << order;
            // The matrix form solves each column exactly as the vector form does.
            EXPECT_EQ(solutions.getColVector(column), x) << order;
        }

        double det = 0.0;
        ASSERT_TRUE(lu.Determinant(&det));
        const double reference = wideDeterminant(a);
        EXPECT_LE(std::fabs(det - reference), 1e-12 * std::fabs(reference)) << order;
        EXPECT_EQ(determinantWithThrow(a), det);

        Dense inverted;
        ASSERT_TRUE(inverse(a, &inverted));
        const Dense product = a * inverted;
        for (int i = 0; i < order; ++i) {
            for (int j = 0; j < order; ++j) {
                EXPECT_NEAR(product(i, j), i == j ? 1.0 : 0.0, 1e-11) << order;
            }
        }
    }
}

TEST(MatrixLU, KnownDeterminantsAndPivots) {
    struct Case {
        const char* what;
        int order;
        Vector rows;
        double determinant;
        std::vector<int> index;
        double parity;
    };
    const Case cases[] = {
        {"exchange", 2, {0, 1, 1, 0}, -1.0, {1, 1}, -1.0},
        // Equal scaled candidates: the later row is the pivot.
        {"tie", 2, {1, 1, 1, -1}, -2.0, {1, 1}, -1.0},
        // Scaled pivoting prefers row 1 (1/1 against 2/1000), where plain pivoting takes row 0.
        {"scaled", 2, {2, 1000, 1, 1}, 2 - 1000, {1, 1}, -1.0},
        {"second difference", 3, {2, -1, 0, -1, 2, -1, 0, -1, 2}, 4.0, {0, 1, 2}, 1.0},
        {"cycle", 3, {0, 1, 0, 0, 0, 1, 1, 0, 0}, 1.0, {2, 2, 2}, 1.0},
        {"Vandermonde 1..4", 4, {1, 1, 1, 1, 1, 2, 4, 8, 1, 3, 9, 27, 1, 4, 16, 64}, 12.0, {}, 0},
        {"single small element", 1, {1e-13}, 1e-13, {0}, 1.0},
        {"pivot just above the singularity fuzz", 2, {4.1e-12, 0, 0, 1}, 4.1e-12, {0, 1}, 1.0},
    };
    for (const Case& c : cases) {
        const Dense a = fromRows(c.order, c.rows);
        const LUDecomposition lu(a);
        double det = 0.0;
        ASSERT_TRUE(lu.Determinant(&det)) << c.what;
        EXPECT_NEAR(det, c.determinant, 1e-13 * std::fabs(c.determinant)) << c.what;
        if (!c.index.empty()) {
            EXPECT_EQ(std::vector<int>(lu.index().begin(), lu.index().end()), c.index) << c.what;
            EXPECT_EQ(lu.parity(), c.parity) << c.what;
        }
    }

    // Hilbert matrix of order 4: 1 / 6048000.
    Dense hilbert(4, 4);
    for (int i = 0; i < 4; ++i) {
        for (int j = 0; j < 4; ++j) hilbert(i, j) = 1.0 / (i + j + 1);
    }
    // Rounding 1/3, 1/5, ... moves the determinant by up to the condition number (1.6e4) times
    // the rounding error; against the rounded matrix's own determinant the agreement is close.
    const double det = determinantWithThrow(hilbert);
    EXPECT_NEAR(det, wideDeterminant(hilbert), 1e-13 * std::fabs(det));
    EXPECT_NEAR(det, 1.0 / 6048000.0, 1e-10 / 6048000.0);
}

TEST(MatrixLU, FreeIteratorMatchesTheClass) {
    std::mt19937_64 engine(8);
    const Dense a = randomOfKind<Dense>(9, 9, engine);
    std::vector<int> index;
    double parity = 0.0;
    const Dense factors = LUDecompSafeIterator(a, index, parity);
    const LUDecomposition lu(a);
    EXPECT_EQ(factors.getRowVector(0), lu.factors().getRowVector(0));
    EXPECT_EQ(factors.getRowVector(8), lu.factors().getRowVector(8));
    EXPECT_EQ(index, std::vector<int>(lu.index().begin(), lu.index().end()));
    EXPECT_EQ(parity, lu.parity());

    const Dense singular = LUDecompSafeIterator(Dense(3, 3, 1.0), index, parity);
    EXPECT_EQ(singular.rowCount(), 0);
    EXPECT_EQ(singular.colCount(), 0);
}

TEST(MatrixLU, SingularAndNearlySingular) {
    struct Case {
        const char* what;
        int order;
        Vector rows;
    };
    const Case singular[] = {
        {"zero element", 1, {0.0}},
        {"small pivot beside a large one", 2, {1e-13, 0, 0, 1}},
        {"pivot just below the singularity fuzz", 2, {3.9e-12, 0, 0, 1}},
        {"zero row", 3, {1, 2, 3, 0, 0, 0, 4, 5, 6}},
        {"rank two", 3, {1, 2, 3, 4, 5, 6, 7, 8, 9}},
        {"rows 1e-12 apart", 2, {1, 1, 1, 1 + 1e-12}},
    };
    for (const Case& c : singular) {
        const LUDecomposition lu(fromRows(c.order, c.rows));
        EXPECT_TRUE(lu.isSingular()) << c.what;
        EXPECT_EQ(lu.factors().rowCount(), 0) << c.what;
        double det = 7.0;
        EXPECT_FALSE(lu.Determinant(&det)) << c.what;
        EXPECT_EQ(det, 0.0) << c.what;
        Dense inverted(2, 2, 1.0);
        EXPECT_FALSE(lu.Inverse(&inverted)) << c.what;
        EXPECT_EQ(inverted.rowCount() + inverted.colCount(), 0) << c.what;
        Vector x(3, 1.0);
        EXPECT_FALSE(lu.Solve(Vector(c.order, 1.0), &x)) << c.what;
        EXPECT_TRUE(x.empty()) << c.what;
        Dense solutions(2, 2);
        EXPECT_FALSE(lu.Solve(Dense(c.order, 1, 1.0), &solutions)) << c.what;
        EXPECT_EQ(solutions.rowCount() + solutions.colCount(), 0) << c.what;
        EXPECT_EQ(messageOf<MatrixSingular>([&] { inverseWithThrow(fromRows(c.order, c.rows)); }),
                  "Matrix is singular")
            << c.what;
        EXPECT_EQ(
            messageOf<MatrixSingular>([&] { determinantWithThrow(fromRows(c.order, c.rows)); }),
            "Matrix is singular")
            << c.what;
    }

    // Rows 1e-10 apart keep a pivot well above the singularity threshold; the determinant is the
    // difference of the two corner elements, exactly.
    double det = 0.0;
    EXPECT_TRUE(determinant(fromRows(2, {1, 1, 1, 1 + 1e-10}), &det));
    EXPECT_EQ(det, (1 + 1e-10) - 1);
}

TEST(MatrixLU, InterfaceChecks) {
    const Dense a = fromRows(2, {4, 1, 2, 3});
    const LUDecomposition lu(a);
    Dense b(2, 1, 1.0);
    const std::string file = " src/matrix/matrix_ludecomposition: ";
    struct Case {
        const char* what;
        std::function<void()> action;
        std::string message;
    };
    const Case assertions[] = {
        {"determinant", [&] { lu.Determinant(nullptr); },
         "assertion failed: (result)" + file + "322"},
        {"vector solve",
         [&] {
             lu.Solve(Vector{1, 1}, nullptr);
         },
         "assertion failed: (x)" + file + "346"},
        {"matrix solve", [&] { lu.Solve(b, nullptr); }, "assertion failed: (X)" + file + "361"},
        {"solve into B", [&] { lu.Solve(b, &b); }, "assertion failed: (&B != X)" + file + "362"},
        {"inverse", [&] { lu.Inverse(nullptr); }, "assertion failed: (result)" + file + "397"},
    };
    for (const Case& c : assertions) {
        EXPECT_EQ(messageOf<AllegeException>(c.action), c.message) << c.what;
    }

    const std::string notSquare = "LU Decomp is defined for only square matrices";
    EXPECT_EQ(messageOf<MatrixException>([] { LUDecomposition(Dense(2, 3)); }), notSquare);
    EXPECT_EQ(messageOf<MatrixException>([] {
                  std::vector<int> index;
                  double parity = 0.0;
                  LUDecompSafeIterator(Dense(3, 2), index, parity);
              }),
              notSquare);

    // A right-hand side of the wrong length is refused rather than read out of range.
    Vector x;
    EXPECT_THROW(lu.Solve(Vector{1, 2, 3}, &x), MatrixException);
}

}  // namespace
