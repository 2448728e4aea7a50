// Storage, conversions, checked access and the texts of the matrix library's errors.
#include <gtest/gtest.h>

#include <cmath>
#include <stdexcept>
#include <vector>

#include "matrix/allege.h"
#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_functions.h"
#include "matrix/matrix_new.h"
#include "matrix_test_support.h"

namespace {

using kelstat_test::messageOf;
using vek::allege::AllegeException;
using vek::matrix_library::Dmatrix;
using vek::matrix_library::matrix;
using vek::matrix_library::MatrixException;
using vek::matrix_library::MatrixSingular;
using vek::matrix_library::Smatrix;
using vek::matrix_library::UTmatrix;
using Vector = std::vector<double>;

// Rows (1, 2, 3) and (4, 5, 6).
matrix<double> twoByThree() {
    return matrix<double>(Vector{1, 2, 3, 4, 5, 6}, 3);
}

std::string failure(const char* condition, const char* file, int line) {
    return std::string("assertion failed: (") + condition + ") src/matrix/" + file + ": " +
           std::to_string(line);
}

TEST(MatrixStorage, DenseIsRowMajorAndConvertsFromThePackedKinds) {
    const matrix<double> a = twoByThree();
    EXPECT_EQ(a.rowCount(), 2);
    EXPECT_EQ(a.colCount(), 3);
    EXPECT_EQ(a.size(), 6);
    EXPECT_EQ(a(1, 0), 4.0);
    a.CheckInvariant();

    Smatrix<double> s(3);
    s(2, 0) = 7.0;
    s(1, 1) = 5.0;
    const matrix<double> mirrored(s);
    EXPECT_EQ(mirrored(0, 2), 7.0);
    EXPECT_EQ(mirrored(2, 0), 7.0);
    EXPECT_EQ(mirrored(1, 1), 5.0);

    const UTmatrix<double> u(3, Vector{1, 2, 3, 4, 5, 6});
    const matrix<double> upper(u);
    const Vector expectedUpper{1, 2, 3, 0, 4, 5, 0, 0, 6};
    std::vector<double> flat;
    upper.mFlattenMatrix(flat, 0, true);
    EXPECT_EQ(flat, expectedUpper);
    upper.mFlattenMatrix(flat, 1, false);
    EXPECT_EQ(flat, (Vector{2, 4, 0, 3, 5, 6}));
    EXPECT_EQ(matrix<double>(u.transpose())(2, 1), 5.0);

    Dmatrix<double> d(2, 3.0);
    const matrix<double> diagonal(d);
    EXPECT_EQ(diagonal(0, 0), 3.0);
    EXPECT_EQ(diagonal(0, 1), 0.0);

    EXPECT_EQ(vek::matrix_library::CreateRowVector(Vector{1, 2, 3}).rowCount(), 1);
    EXPECT_TRUE(vek::matrix_library::CreateRowVector(Vector{}).empty());
}

TEST(MatrixStorage, PackedSymmetricSharesMirroredElements) {
    Smatrix<double> s(3, 0.0);
    EXPECT_EQ(s.size(), 6);
    EXPECT_EQ(Smatrix<double>::calculate_size(3), 6);
    int next = 1;
    for (int i = 0; i < 3; ++i) {
        for (int j = 0; j <= i; ++j) s(j, i) = next++;  // written through the upper triangle
    }
    EXPECT_EQ(s.getRowVector(2), (Vector{4, 5, 6}));
    EXPECT_EQ(s.getColVector(0), (Vector{1, 2, 4}));
    // Its upper triangle packed by rows: (0,0), (0,1), (0,2), (1,1), (1,2), (2,2).
    Vector flat;
    matrix<double>(s.mSmatrixToUTmatrix()).mFlattenMatrix(flat, 0, true);
    EXPECT_EQ(flat, (Vector{1, 2, 4, 0, 3, 5, 0, 0, 6}));
    const Smatrix<double> mirrored =
        vek::matrix_library::mUTmatrixToSmatrix(UTmatrix<double>(3, Vector{1, 2, 4, 3, 5, 6}));
    EXPECT_EQ(mirrored.getRowVector(1), s.getRowVector(1));
    s.mFlattenMatrix(flat, 2, true);
    EXPECT_EQ(flat, (Vector{4, 5, 6}));
}

TEST(MatrixStorage, UpperTriangleIgnoresWritesBelowTheDiagonal) {
    UTmatrix<double> u(3, Vector{1, 2, 3, 4, 5, 6});
    EXPECT_EQ(u.size(), 6);
    EXPECT_EQ(u(1, 2), 5.0);
    EXPECT_EQ(u(2, 2), 6.0);
    EXPECT_EQ(u.at(2, 0), 0.0);
    u(2, 0) = 9.0;
    u.at(1, 0) = 8.0;
    EXPECT_EQ(u(2, 0), 0.0);
    const matrix<double> dense(u);
    EXPECT_EQ(dense(2, 0), 0.0);
    EXPECT_EQ(dense(1, 0), 0.0);
    EXPECT_EQ(dense(1, 1), 4.0);

    Dmatrix<double> d(2, 1.0);
    d(0, 1) = 4.0;
    EXPECT_EQ(static_cast<const Dmatrix<double>&>(d)(0, 1), 0.0);
}

TEST(MatrixStorage, AssertionTextsNameConditionFileAndLine) {
    matrix<double> a(2, 2, 0.0);
    const matrix<double>& constA = a;
    Smatrix<double> s(2);
    const Smatrix<double>& constS = s;
    UTmatrix<double> u(2);
    const UTmatrix<double>& constU = u;
    Dmatrix<double> d(2);
    const Dmatrix<double>& constD = d;
    struct Case {
        std::function<void()> action;
        std::string expected;
    };
    const Case cases[] = {
        {[&] { a.at(2, 0); }, failure("row >= 0 && row < m_", "matrix_new", 162)},
        {[&] { a.at(0, -1); }, failure("column >= 0 && column < n_", "matrix_new", 163)},
        {[&] { constA.at(-1, 0); }, failure("row >= 0 && row < m_", "matrix_new", 170)},
        {[&] { constA.at(0, 2); }, failure("column >= 0 && column < n_", "matrix_new", 171)},
        {[&] { s.at(2, 0); }, failure("i >= 0 && i < m_", "matrix_new", 443)},
        {[&] { s.at(0, 2); }, failure("j >= 0 && j < m_", "matrix_new", 444)},
        {[&] { constS.at(2, 0); }, failure("i >= 0 && i < m_", "matrix_new", 451)},
        {[&] { constS.at(0, 2); }, failure("j >= 0 && j < m_", "matrix_new", 452)},
        {[&] { u.at(2, 0); }, failure("row >= 0 && row < m_", "matrix_new", 588)},
        {[&] { u.at(0, 2); }, failure("column >= 0 && column < m_", "matrix_new", 589)},
        {[&] { constU.at(2, 0); }, failure("row >= 0 && row < m_", "matrix_new", 597)},
        {[&] { constU.at(0, 2); }, failure("column >= 0 && column < m_", "matrix_new", 598)},
        {[&] { d.at(2, 0); }, failure("row >= 0 && row < m_", "matrix_new", 696)},
        {[&] { d.at(0, 2); }, failure("column >= 0 && column < m_", "matrix_new", 697)},
        {[&] { constD.at(2, 0); }, failure("row >= 0 && row < m_", "matrix_new", 704)},
        {[&] { constD.at(0, 2); }, failure("column >= 0 && column < m_", "matrix_new", 705)},
        {[&] { a += matrix<double>(2, 3); },
         failure("m_ == other.m_ && n_ == other.n_", "matrix_impl", 236)},
        {[&] { a -= matrix<double>(3, 2); },
         failure("m_ == other.m_ && n_ == other.n_", "matrix_impl", 256)},
        {[&] { twoByThree().ConvertToSmatrix(); }, failure("rows == cols", "matrix_impl", 304)},
        {[&] { Smatrix<double> fromDense(twoByThree()); },
         failure("rows == cols", "matrix_impl", 304)},
        {[&] { a.getCol(2); }, failure("0 <= j && j < n_", "matrix_impl", 558)},
        {[&] { a.getColVector(-1); }, failure("0 <= j && j < n_", "matrix_impl", 586)},
        {[&] { a.setRow(2, matrix<double>(1, 2)); },
         failure("0 <= i && i < m_", "matrix_impl", 605)},
        {[&] {
             a.setRow(-1, Vector{1, 2});
         },
         failure("0 <= i && i < m_", "matrix_impl", 628)},
        {[&] { a.setCol(2, matrix<double>(2, 1)); },
         failure("0 <= j && j < n_", "matrix_impl", 644)},
        {[&] {
             a.setCol(2, Vector{1, 2});
         },
         failure("0 <= j && j < n_", "matrix_impl", 667)},
        {[&] { a.removeRow(2); }, failure("0 <= i && i < m_", "matrix_impl", 693)},
        {[&] { a.removeCol(-1); }, failure("0 <= j && j < n_", "matrix_impl", 727)},
        {[&] {
             UTmatrix<double> bad(3, Vector{1, 2, 3});
         },
         failure("static_cast<int>( v.size() ) == calculate_size( m )", "matrix_upper_impl", 31)},
        {[&] { s.getRowVector(2); }, failure("i >= 0 && i < m_", "matrix_symmetric_impl", 143)},
        {[&] { s.getColVector(-1); }, failure("j >= 0 && j < m_", "matrix_symmetric_impl", 161)},
        {[&] { s.insertColRow(3, 0.0); },
         failure("target_row >= 0 && target_row < m_ + 1", "matrix_symmetric_impl", 191)},
        {[&] { s.removeColRow(2); }, failure("j >= 0 && j < m_", "matrix_symmetric_impl", 279)},
        {[&] { vek::matrix_library::CholeskyDecomp(constS, nullptr); },
         failure("result", "matrix_functions", 1111)},
        {[&] { vek::matrix_library::inverse(constD, nullptr); },
         failure("result", "matrix_functions", 1414)},
        {[&] { vek::matrix_library::inverse(constS, nullptr); },
         failure("result", "matrix_functions", 1594)},
    };
    for (const Case& c : cases) EXPECT_EQ(messageOf<AllegeException>(c.action), c.expected);
    EXPECT_EQ(messageOf<AllegeException>([] { vek::allege::AllegeFailure("x", "f", 7); }),
              "assertion failed: (x) f: 7");
}

TEST(MatrixStorage, MisuseMessages) {
    matrix<double> a(2, 2, 1.0);
    Smatrix<double> s(2, 1.0);
    Dmatrix<double> d(3, 1.0);
    struct Case {
        std::function<void()> action;
        const char* expected;
    };
    const Case cases[] = {
        {[&] { twoByThree().ConvertToVector(); }, "vector cast: result not a vector"},
        {[&] { static_cast<Vector>(twoByThree().getRow(0)); }, "vector cast: result not a vector"},
        {[&] { a.setRow(0, matrix<double>(1, 3)); }, "matrix::setRow incompatible matrices"},
        {[&] { a.setCol(0, Vector{1}); }, "matrix::setCol incompatible matrices"},
        {[&] { matrix<double>().addRow(1.0); }, "addRow operating on a null matrix"},
        {[&] { matrix<double>(2, 0).addCol(1.0); }, "addCol operating on a null matrix"},
        {[&] {
             a.addRow(Vector{1, 2, 3});
         },
         "addRow row std::vector must be of same order"},
        {[&] { a.addCol(Vector{1}); }, "addCol column std::vector must be of same order"},
        {[&] { a.insertRow(0, Vector{1}); }, "addRow row std::vector must be of same order"},
        {[&] {
             a.insertCol(0, Vector{1, 2, 3});
         },
         "addCol column std::vector must be of same order"},
        {[&] { a.setSubmatrix(1, 1, matrix<double>(2, 1)); },
         "matrix::setSubmatrix incompatible matrices"},
        {[&] { a.setSubmatrix(-1, 0, matrix<double>(1, 1)); },
         "matrix::setSubmatrix incompatible matrices"},
        {[&] { a.getSubmatrix(0, 1, 1, 2); }, "matrix::getSubmatrix incompatible matrices"},
        {[&] {
             s.insertColRow(0, Vector{1, 2});
         },
         "insertColRow: vector length must be 1 more than the number of rows in the matrix"},
        {[&] { d.setSubmatrix(2, 2, Dmatrix<double>(2)); },
         "Dmatrixmatrix::setSubmatrix incompatible matrices"},
        {[&] {
             matrix<double>(Vector{1, 2, 3}, 2);
         },
         "matrix: vector length is not a multiple of the column count"},
        {[&] { matrix<double>(-1, 2); }, "matrix: negative dimension"},
        {[&] { matrix<double>(70000, 70000); }, "matrix: too many elements"},
        {[&] { Smatrix<double>(70000); }, "matrix: too many elements"},
    };
    for (const Case& c : cases) EXPECT_EQ(messageOf<MatrixException>(c.action), c.expected);

    Smatrix<double> asymmetric(2);
    EXPECT_EQ(messageOf<std::domain_error>([] { Smatrix<double>(twoByThree(), true); }),
              "Originating matrix must be a square matrix");
    EXPECT_EQ(messageOf<std::overflow_error>([&] { a / 0.0; }), "op/ scalar division by zero");
    EXPECT_EQ(messageOf<std::overflow_error>([&] { a /= -0.0; }), "op/ scalar division by zero");
    EXPECT_EQ(messageOf<MatrixSingular>([] { inverseWithThrow(Dmatrix<double>(2, 0.0)); }),
              "Matrix is singular");
}

// Arguments the design leaves unchecked are refused rather than read out of bounds.
TEST(MatrixStorage, UncheckedArgumentsAreRefused) {
    matrix<double> a(2, 2, 1.0);
    Smatrix<double> s(2, 1.0);
    UTmatrix<double> u(2, 1.0);
    Dmatrix<double> d(2, 1.0);
    Vector v{1.0, 2.0};
    Vector none;
    struct Case {
        std::function<void()> action;
        const char* expected;
    };
    const Case cases[] = {
        {[&] { a.insertRow(3, 0.0); }, "insertRow: row index out of range"},
        {[&] { a.insertCol(-1, 0.0); }, "insertCol: column index out of range"},
        {[&] { a.mFlattenMatrix(v, -1, true); }, "mFlattenMatrix: negative start index"},
        {[&] { s.getSubmatrix(1, 0, 2, 1); }, "Smatrix::getSubmatrix incompatible matrices"},
        {[&] { s.UpdateForFisher(v, v, v, 3); },
         "UpdateForFisher: count exceeds the order or a vector's length"},
        {[&] { s.UpdateForFisher(v, Vector{1.0}, v, 2); },
         "UpdateForFisher: count exceeds the order or a vector's length"},
        {[&] { d.removeColRow(2); }, "Dmatrix::removeColRow index out of range"},
        {[&] { u.CholeskyDecomp(-1, nullptr, nullptr); }, "UTmatrix: starting row is negative"},
        {[&] { vek::matrix_library::KTimesColumn(s, 1.0, 2, 1); },
         "matrix: column index out of range"},
        {[&] { vek::matrix_library::KTimesColumnPlusVector(u, 1.0, 0, none, 2); },
         "matrix: vector shorter than the number of products"},
    };
    for (const Case& c : cases) EXPECT_EQ(messageOf<MatrixException>(c.action), c.expected);
}

TEST(MatrixStorage, SymmetricCastToleratesRoundingOnly) {
    matrix<double> a(Vector{2.0, 1.0 + 3e-12, 1.0, 5.0}, 2);
    const Smatrix<double> s = a.ConvertToSmatrix();
    EXPECT_EQ(s(1, 0), 1.0);
    a(0, 1) = 1.001;
    EXPECT_EQ(messageOf<MatrixException>([&] { Smatrix<double> rejected(a); }),
              "Smatrix cast: result not a symmetric matrix");
    // The flag forms take one triangle without looking at the other.
    EXPECT_EQ(Smatrix<double>(a, true)(0, 1), 1.0);
    EXPECT_EQ(Smatrix<double>(a, false)(0, 1), 1.001);
}

TEST(MatrixStorage, RowAndColumnEditing) {
    matrix<double> a = twoByThree();
    EXPECT_EQ(a.getRowVector(1), (Vector{4, 5, 6}));
    EXPECT_EQ(a.getColVector(2), (Vector{3, 6}));
    EXPECT_EQ(a.getCol(1).ConvertToVector(), (Vector{2, 5}));
    a.setRow(0, Vector{7, 8, 9});
    a.setCol(2, matrix<double>(Vector{0, 1}, 2));
    EXPECT_EQ(a.getRowVector(0), (Vector{7, 8, 0}));
    EXPECT_EQ(a.getRowVector(1), (Vector{4, 5, 1}));

    a.addRow(Vector{1, 2, 3});
    a.addCol(Vector{10, 11, 12});
    EXPECT_EQ(a.rowCount(), 3);
    EXPECT_EQ(a.colCount(), 4);
    EXPECT_EQ(a.getColVector(3), (Vector{10, 11, 12}));
    a.insertRow(0, -1.0);
    a.insertCol(1, Vector{20, 21, 22, 23});
    EXPECT_EQ(a.getRowVector(0), (Vector{-1, 20, -1, -1, -1}));
    EXPECT_EQ(a.getColVector(1), (Vector{20, 21, 22, 23}));
    EXPECT_EQ(a.size(), 20);
    a.removeRow(0);
    a.removeCol(1);
    EXPECT_EQ(a.getRowVector(0), (Vector{7, 8, 0, 10}));
    EXPECT_EQ(a.delCol(3).delRow(2).getRowVector(1), (Vector{4, 5, 1}));

    matrix<double> empty;
    empty.addRow(Vector{1, 2});
    EXPECT_EQ(empty.rowCount(), 1);
    EXPECT_EQ(empty.colCount(), 2);

    matrix<double> block(3, 3, 0.0);
    block.setSubmatrix(1, 1, matrix<double>(2, 2, 4.0));
    EXPECT_EQ(block.getSubmatrix(1, 0, 2, 2).getRowVector(1), (Vector{0, 4}));
    EXPECT_EQ(block.getRowVector(0), (Vector{0, 0, 0}));

    matrix<double> column;
    column = Vector{1, 2, 3, 4};
    EXPECT_EQ(column.rowCount(), 4);
    EXPECT_EQ(column.colCount(), 1);
    matrix<double> square(Vector{1, 2, 3, 4}, 2);
    square = Vector{1, 2, 3, 4};  // already holds these elements: left as it is
    EXPECT_EQ(square.colCount(), 2);
}

TEST(MatrixStorage, ArithmeticMembers) {
    matrix<double> a = twoByThree();
    const matrix<double> t = a.transpose();
    EXPECT_EQ(t.rowCount(), 3);
    EXPECT_EQ(t(2, 1), 6.0);
    EXPECT_EQ((-a)(0, 0), -1.0);
    EXPECT_EQ((a * 2.0)(1, 2), 12.0);
    EXPECT_EQ((a / 4.0)(0, 1), 0.5);
    a += twoByThree();
    a -= matrix<double>(2, 3, 1.0);
    EXPECT_EQ(a.getRowVector(1), (Vector{7, 9, 11}));
    a = 3.0;
    EXPECT_EQ(a.getRowVector(0), (Vector{3, 3, 3}));
    matrix<double> other;
    a.swap(other);
    EXPECT_TRUE(a.empty());
    EXPECT_EQ(other.size(), 6);
}

TEST(MatrixStorage, QuadraticForms) {
    const matrix<double> a(Vector{2, 1, 1, 2}, 2);
    EXPECT_EQ(a.mQuadraticForm(Vector{1, 2}), 14.0);
    EXPECT_EQ(Smatrix<double>(a).mQuadraticForm(Vector{1, 2}), 14.0);
    EXPECT_EQ(matrix<double>().mQuadraticForm(Vector{}), 0.0);
    EXPECT_EQ(messageOf<MatrixException>([] {
                  twoByThree().mQuadraticForm(Vector{1, 2, 3});
              }),
              "matrix::quadratic form is only defined for square matrices");
    EXPECT_EQ(messageOf<MatrixException>([&] { a.mQuadraticForm(Vector{1}); }),
              "matrix::matrix and vector have incompatible dimensions");
    EXPECT_EQ(messageOf<MatrixException>([] { Smatrix<double>(2).mQuadraticForm(Vector{}); }),
              "matrix::matrix and vector have incompatible dimensions");
}

TEST(MatrixStorage, SymmetricInsertAndRemoveKeepTheMapping) {
    // Rows (1 2 4), (2 3 5), (4 5 6).
    Smatrix<double> s(3);
    const double lower[] = {1, 2, 3, 4, 5, 6};
    int next = 0;
    for (int i = 0; i < 3; ++i) {
        for (int j = 0; j <= i; ++j) s(i, j) = lower[next++];
    }
    Smatrix<double> grown(s);
    grown.insertColRow(1, 9.0);
    EXPECT_EQ(grown.rowCount(), 4);
    EXPECT_EQ(grown.getRowVector(0), (Vector{1, 9, 2, 4}));
    EXPECT_EQ(grown.getRowVector(1), (Vector{9, 9, 9, 9}));
    EXPECT_EQ(grown.getRowVector(3), (Vector{4, 9, 5, 6}));
    EXPECT_EQ(grown.delColRow(1).getRowVector(2), s.getRowVector(2));

    grown = s;
    grown.insertColRow(3, Vector{7, 8, 9, 10});
    EXPECT_EQ(grown.getColVector(3), (Vector{7, 8, 9, 10}));
    grown.removeColRow(0);
    EXPECT_EQ(grown.getRowVector(0), (Vector{3, 5, 8}));

    EXPECT_EQ(s.getSubmatrix(1, 0, 2, 3).getRowVector(0), (Vector{2, 3, 5}));

    Smatrix<double> fisher(2, 0.0);
    fisher.UpdateForFisher(Vector{1, 2}, Vector{10, 20}, Vector{3, 4}, 2);
    EXPECT_EQ(fisher(0, 0), 13.0);
    EXPECT_EQ(fisher(1, 0), 14.0);
    EXPECT_EQ(fisher(1, 1), 28.0);
    fisher.UpdateForFisher(Vector{}, Vector{}, Vector{}, 0);
    EXPECT_EQ(fisher(1, 1), 28.0);
}

TEST(MatrixStorage, DiagonalOperationsAndInverse) {
    Dmatrix<double> d(3, 2.0);
    d(1, 1) = 4.0;
    EXPECT_EQ(d.getCol(1).ConvertToVector(), (Vector{0, 4, 0}));
    Dmatrix<double> inverted;
    ASSERT_TRUE(vek::matrix_library::inverse(d, &inverted));
    EXPECT_EQ(inverted(1, 1), 0.25);
    d.setSubmatrix(1, 1, Dmatrix<double>(2, 7.0));
    EXPECT_EQ(d(2, 2), 7.0);
    d.setSubmatrix(0, 1, Dmatrix<double>(2, 8.0));  // off-diagonal block: nothing to copy
    EXPECT_EQ(d(0, 0), 2.0);
    d(2, 2) = 0.0;
    EXPECT_FALSE(vek::matrix_library::inverse(d, &inverted));
    EXPECT_TRUE(inverted.isEmpty());
    d.removeColRow(2);
    EXPECT_EQ(d.rowCount(), 2);
}

TEST(MatrixStorage, FuzzyCompareAndSignTransfer) {
    using vek::matrix_library::mCompareWithFuzz;
    using vek::matrix_library::mTransferSign;
    EXPECT_EQ(mCompareWithFuzz(1.0, 1.0 + 1e-13, 99.0, 1e-12), 0);
    EXPECT_EQ(mCompareWithFuzz(1.0, 1.0 + 1e-11, 0.0, 1e-12), -1);
    EXPECT_EQ(mCompareWithFuzz(1.0 + 1e-11, 1.0, 0.0, 1e-12), 1);
    EXPECT_EQ(mCompareWithFuzz(0.0, 0.0, 0.0, 1e-12), 0);
    EXPECT_EQ(mCompareWithFuzz(std::nan(""), 1.0, 0.0, 1e-12), 1);
    EXPECT_EQ(mTransferSign(3.0, -0.0), -3.0);
    EXPECT_EQ(mTransferSign(-3.0, 0.0), 3.0);
}

}  // namespace
