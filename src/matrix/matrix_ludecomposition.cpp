#include "matrix/matrix_ludecomposition.h"

#include <cmath>
#include <cstddef>
#include <utility>

#include "matrix/allege.h"
#include "matrix/matrix_exceptions.h"

namespace vek::matrix_library {

namespace {

using allege::allegeThat;
using allege::CheckSite;

constexpr char kLuFile[] = "src/matrix/matrix_ludecomposition";
constexpr CheckSite kBackSubstituteOutput{"X", kLuFile, 217};
constexpr CheckSite kBackSubstituteDiagonal{"lhs( i, i )", kLuFile, 265};
constexpr CheckSite kDeterminantResult{"result", kLuFile, 322};
constexpr CheckSite kSolveVectorOutput{"x", kLuFile, 346};
constexpr CheckSite kSolveMatrixOutput{"X", kLuFile, 361};
constexpr CheckSite kSolveMatrixAliased{"&B != X", kLuFile, 362};
constexpr CheckSite kInverseResult{"result", kLuFile, 397};

// A row maximum or pivot this close to zero, absolutely or relative to itself, makes the matrix
// singular: dividing by it would amplify rounding beyond anything useful.
constexpr double kSingularFuzz = 4e-12;

// p equals 0 within a relative and an absolute tolerance of kSingularFuzz each; NaN is not zero.
bool isFuzzyZero(double p) {
    const double magnitude = std::fabs(p);
    return magnitude < kSingularFuzz * magnitude + kSingularFuzz;
}

std::size_t toIndex(int i) {
    return static_cast<std::size_t>(i);
}

// a itself, once it is known to be square.
template <class T>
const matrix<T>& requireSquare(const matrix<T>& a) {
    if (a.rowCount() != a.colCount()) {
        throw MatrixException("LU Decomp is defined for only square matrices");
    }
    return a;
}

// 1 / (largest magnitude) of every row, or false when some row is zero within the fuzz.
template <class T>
bool rowScales(const matrix<T>& a, std::vector<T>& scale) {
    const int n = a.rowCount();
    scale.assign(toIndex(n), T());
    for (int i = 0; i < n; ++i) {
        T big = T();
        for (int j = 0; j < n; ++j) {
            const T magnitude = std::fabs(a(i, j));
            if (magnitude > big) big = magnitude;
        }
        if (isFuzzyZero(big)) return false;
        scale[toIndex(i)] = T(1) / big;
    }
    return true;
}

// a(i, j) minus the dot product of row i of L with column j of U over the first `terms`
// indexes, subtracted one term at a time as Crout's scheme does.
template <class T>
T croutReduced(const matrix<T>& a, int i, int j, int terms) {
    T sum = a(i, j);
    for (int k = 0; k < terms; ++k) sum -= a(i, k) * a(k, j);
    return sum;
}

template <class T>
void swapRows(matrix<T>& a, int first, int second) {
    for (int k = 0; k < a.colCount(); ++k) std::swap(a(first, k), a(second, k));
}

// Crout's decomposition of a square a in place with implicit partial pivoting. Returns false,
// leaving a partly reduced, as soon as the matrix shows itself singular.
template <class T>
bool decomposeInPlace(matrix<T>& a, std::vector<int>& index, double& parity) {
    const int n = a.rowCount();
    index.assign(toIndex(n), 0);
    parity = 1.0;
    // A single element has no row scale to judge it by: only an exact zero is singular.
    if (n == 1) return a(0, 0) != T();

    std::vector<T> scale;
    if (!rowScales(a, scale)) return false;

    for (int j = 0; j < n; ++j) {
        for (int i = 0; i < j; ++i) a(i, j) = croutReduced(a, i, j, i);

        // Pivot: the largest scaled candidate; ">=" lets a later row win a tie.
        T best = T();
        int pivotRow = j;
        for (int i = j; i < n; ++i) {
            a(i, j) = croutReduced(a, i, j, j);
            const T figure = scale[toIndex(i)] * std::fabs(a(i, j));
            if (!(figure < best)) {
                best = figure;
                pivotRow = i;
            }
        }
        if (pivotRow != j) {
            swapRows(a, pivotRow, j);
            parity = -parity;
            scale[toIndex(pivotRow)] = scale[toIndex(j)];
        }
        index[toIndex(j)] = pivotRow;

        if (isFuzzyZero(a(j, j))) return false;
        if (j != n - 1) {
            const T pivot = a(j, j);
            for (int i = j + 1; i < n; ++i) a(i, j) /= pivot;
        }
    }
    return true;
}

}  // namespace

template <class T>
matrix<T> LUDecompSafeIterator(matrix<T> a, std::vector<int>& index, double& parity) {
    requireSquare(a);
    if (!decomposeInPlace(a, index, parity)) a.resize(0, 0);
    return a;
}

template matrix<double> LUDecompSafeIterator(matrix<double> a, std::vector<int>& index,
                                             double& parity);

LUDecomposition::LUDecomposition(const matrix<double>& a) : factors_(requireSquare(a)) {
    if (!decomposeInPlace(factors_, index_, parity_)) {
        factors_.resize(0, 0);
        singular_ = true;
    }
}

// Forward substitution through the recorded interchanges, then back substitution with U. Leading
// zeros of the permuted right-hand side are skipped: their rows of L contribute nothing.
void LUDecomposition::backSubstitute(std::vector<double>* X) const {
    allegeThat(X != nullptr, kBackSubstituteOutput);
    std::vector<double>& x = *X;
    const matrix<double>& lhs = factors_;
    const int n = lhs.rowCount();

    int firstNonzero = -1;
    for (int i = 0; i < n; ++i) {
        const std::size_t pivotRow = toIndex(index_[toIndex(i)]);
        double sum = x[pivotRow];
        x[pivotRow] = x[toIndex(i)];
        if (firstNonzero >= 0) {
            for (int k = firstNonzero; k < i; ++k) sum -= lhs(i, k) * x[toIndex(k)];
        } else if (sum != 0.0) {
            firstNonzero = i;
        }
        x[toIndex(i)] = sum;
    }

    for (int i = n - 1; i >= 0; --i) {
        double sum = x[toIndex(i)];
        for (int k = i + 1; k < n; ++k) sum -= lhs(i, k) * x[toIndex(k)];
        allegeThat(lhs(i, i) != 0.0, kBackSubstituteDiagonal);
        x[toIndex(i)] = sum / lhs(i, i);
    }
}

bool LUDecomposition::Determinant(double* result) const {
    allegeThat(result != nullptr, kDeterminantResult);
    if (singular_) {
        *result = 0.0;
        return false;
    }
    double product = parity_;
    for (int i = 0; i < factors_.rowCount(); ++i) product *= factors_(i, i);
    *result = product;
    return true;
}

bool LUDecomposition::Solve(const std::vector<double>& b, std::vector<double>* x) const {
    allegeThat(x != nullptr, kSolveVectorOutput);
    if (singular_) {
        x->clear();
        return false;
    }
    if (b.size() != toIndex(factors_.rowCount())) {
        throw MatrixException("LU Decomp: right-hand side length differs from the order");
    }
    *x = b;
    backSubstitute(x);
    return true;
}

bool LUDecomposition::Solve(const matrix<double>& B, matrix<double>* X) const {
    allegeThat(X != nullptr, kSolveMatrixOutput);
    allegeThat(&B != X, kSolveMatrixAliased);
    if (singular_) {
        X->resize(0, 0);
        return false;
    }
    const int n = factors_.rowCount();
    if (B.rowCount() != n) {
        throw MatrixException("LU Decomp: right-hand side length differs from the order");
    }
    X->resize(n, B.colCount());
    for (int column = 0; column < B.colCount(); ++column) {
        std::vector<double> solution = B.getColVector(column);
        backSubstitute(&solution);
        X->setCol(column, solution);
    }
    return true;
}

bool LUDecomposition::Inverse(matrix<double>* result) const {
    allegeThat(result != nullptr, kInverseResult);
    if (singular_) {
        result->resize(0, 0);
        return false;
    }
    const int n = factors_.rowCount();
    matrix<double> identity(n, n, 0.0);
    for (int i = 0; i < n; ++i) identity(i, i) = 1.0;
    return Solve(identity, result);
}

bool inverse(const matrix<double>& a, matrix<double>* result) {
    return LUDecomposition(a).Inverse(result);
}

bool determinant(const matrix<double>& a, double* result) {
    return LUDecomposition(a).Determinant(result);
}

matrix<double> inverseWithThrow(const matrix<double>& a) {
    matrix<double> result;
    if (!inverse(a, &result)) throw MatrixSingular();
    return result;
}

double determinantWithThrow(const matrix<double>& a) {
    double result = 0.0;
    if (!determinant(a, &result)) throw MatrixSingular();
    return result;
}

}  // namespace vek::matrix_library
