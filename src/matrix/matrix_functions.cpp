#include "matrix/matrix_functions.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

#include "matrix/matrix_check_sites.h"
#include "matrix/matrix_exceptions.h"

namespace vek::matrix_library {

using allege::allegeThat;

namespace {

void checkProductCount(int count, int order) {
    if (count > order) throw MatrixException("matrix::number of products greater than dimension");
}

void checkColumn(int column, int order) {
    if (column < 0 || column >= order) throw MatrixException("matrix: column index out of range");
}

void checkVectorLength(const std::vector<double>& v, int count) {
    if (count > 0 && v.size() < static_cast<std::size_t>(count)) {
        throw MatrixException("matrix: vector shorter than the number of products");
    }
}

template <class Matrix>
void flattenInto(const Matrix& a, std::vector<double>& out, int start, bool byRows) {
    if (start < 0) throw MatrixException("mFlattenMatrix: negative start index");
    out.clear();
    const int rows = a.rowCount();
    const int cols = a.colCount();
    if (rows == 0 || cols == 0) return;
    if (byRows) {
        if (start >= rows) return;
        out.reserve(static_cast<std::size_t>(rows - start) * static_cast<std::size_t>(cols));
        for (int i = start; i < rows; ++i) {
            for (int j = 0; j < cols; ++j) out.push_back(a(i, j));
        }
    } else {
        if (start >= cols) return;
        out.reserve(static_cast<std::size_t>(cols - start) * static_cast<std::size_t>(rows));
        for (int j = start; j < cols; ++j) {
            for (int i = 0; i < rows; ++i) out.push_back(a(i, j));
        }
    }
}

template <class Square>
double quadraticForm(const Square& a, const std::vector<double>& x) {
    const int order = a.rowCount();
    if (x.size() != static_cast<std::size_t>(order)) {
        throw MatrixException("matrix::matrix and vector have incompatible dimensions");
    }
    double result = 0.0;
    for (int i = 0; i < order; ++i) {
        double row = 0.0;
        for (int k = 0; k < order; ++k) row += a(i, k) * x[static_cast<std::size_t>(k)];
        result += x[static_cast<std::size_t>(i)] * row;
    }
    return result;
}

// The factor of a from row 0 into factor; false, with factor emptied, when a is not positive
// definite.
bool factorFromFirstRow(const Smatrix<double>& a, UTmatrix<double>& factor) {
    int failIndex = -1;
    double pivot = 0.0;
    factor = CholeskyDecomp(SmatrixToUTmatrix(a), 0, &failIndex, &pivot);
    if (failIndex == -1) return true;
    factor = UTmatrix<double>();
    return false;
}

}  // namespace

UTmatrix<double> SmatrixToUTmatrix(const Smatrix<double>& s) {
    const int order = s.rowCount();
    UTmatrix<double> upper(order);
    for (int i = 0; i < order; ++i) {
        for (int j = i; j < order; ++j) upper(i, j) = s(i, j);
    }
    return upper;
}

Smatrix<double> mUTmatrixToSmatrix(const UTmatrix<double>& u) {
    const int order = u.rowCount();
    Smatrix<double> symmetric(order);
    for (int i = 0; i < order; ++i) {
        for (int j = i; j < order; ++j) symmetric(i, j) = u(i, j);
    }
    return symmetric;
}

void mFlattenmatrix(const matrix<double>& a, std::vector<double>& out, int start, bool byRows) {
    flattenInto(a, out, start, byRows);
}

void mFlattenmatrix(const Smatrix<double>& a, std::vector<double>& out, int start, bool byRows) {
    flattenInto(a, out, start, byRows);
}

UTmatrix<double> CholeskyDecomp(const UTmatrix<double>& u, int start, int* failIndex,
                                double* pivot) {
    int localFailIndex = -1;
    double localPivot = 0.0;
    if (failIndex == nullptr) failIndex = &localFailIndex;
    if (pivot == nullptr) pivot = &localPivot;

    const int order = u.rowCount();
    if (order < start) throw MatrixException("UTmatrix: starting row greater than dimension");
    if (start < 0) throw MatrixException("UTmatrix: starting row is negative");
    UTmatrix<double> r(u);
    *failIndex = -1;
    for (int j = start; j < order; ++j) {
        double sumOfSquares = 0.0;
        for (int i = 0; i < j; ++i) {
            // Rows before start belong to a factor computed earlier and are taken as they are.
            if (i >= start) {
                double dot = 0.0;
                for (int k = 0; k < i; ++k) dot += r(k, i) * r(k, j);
                r(i, j) = (r(i, j) - dot) / r(i, i);
            }
            sumOfSquares += r(i, j) * r(i, j);
        }
        const double d = r(j, j) - sumOfSquares;
        *pivot = d;
        if (d <= 0.0) {
            *failIndex = j;
            *pivot = std::fabs(d);
            return r;
        }
        r(j, j) = std::sqrt(d);
    }
    return r;
}

bool CholeskyDecomp(const Smatrix<double>& a, UTmatrix<double>* factor) {
    allegeThat(factor != nullptr, sites::kCholeskyResult);
    return factorFromFirstRow(a, *factor);
}

UTmatrix<double> CholeskyDecompWithThrow(const Smatrix<double>& a) {
    UTmatrix<double> factor;
    if (!factorFromFirstRow(a, factor)) throw MatrixSingular();
    return factor;
}

std::vector<double> CholeskyBackSub(const UTmatrix<double>& r, const std::vector<double>& b) {
    const int order = r.rowCount();
    if (b.size() != static_cast<std::size_t>(order)) {
        throw MatrixException("UTmatrix: matrix and vector have incompatible dimensions");
    }
    std::vector<double> x(b);
    // R'y = b, by rows of R'.
    for (int i = 0; i < order; ++i) {
        double dot = 0.0;
        for (int k = 0; k < i; ++k) dot += r(k, i) * x[static_cast<std::size_t>(k)];
        x[static_cast<std::size_t>(i)] = (x[static_cast<std::size_t>(i)] - dot) / r(i, i);
    }
    // R x = y, by columns of R.
    for (int i = order - 1; i >= 0; --i) {
        x[static_cast<std::size_t>(i)] /= r(i, i);
        KTimesColumnPlusVector(r, -x[static_cast<std::size_t>(i)], i, x, i);
    }
    return x;
}

Smatrix<double> CholeskyInverse(const UTmatrix<double>& r) {
    const int order = r.rowCount();
    Smatrix<double> s = mUTmatrixToSmatrix(r);
    // R^-1 in place of R; a column read above the diagonal shares its slots with the row below.
    for (int k = 0; k < order; ++k) {
        s(k, k) = 1.0 / s(k, k);
        KTimesColumn(s, -s(k, k), k, k);
        for (int j = k + 1; j < order; ++j) {
            const double t = s(k, j);
            s(k, j) = 0.0;
            KTimesColumnPlusColumn(s, t, k, j, k + 1);
        }
    }
    // R^-1 R^-T, one column at a time.
    for (int j = 0; j < order; ++j) {
        for (int k = 0; k < j; ++k) {
            const double t = s(k, j);
            KTimesColumnPlusColumn(s, t, j, k, k + 1);
        }
        KTimesColumn(s, s(j, j), j, j + 1);
    }
    return s;
}

bool inverse(const Smatrix<double>& a, Smatrix<double>* result) {
    allegeThat(result != nullptr, sites::kSymmetricInverseResult);
    UTmatrix<double> factor;
    if (!factorFromFirstRow(a, factor)) {
        *result = Smatrix<double>();
        return false;
    }
    *result = CholeskyInverse(factor);
    return true;
}

Smatrix<double> inverseWithThrow(const Smatrix<double>& a) {
    return CholeskyInverse(CholeskyDecompWithThrow(a));
}

bool inverse(const Dmatrix<double>& d, Dmatrix<double>* result) {
    allegeThat(result != nullptr, sites::kDiagonalInverseResult);
    const int order = d.rowCount();
    Dmatrix<double> reciprocal(order);
    for (int i = 0; i < order; ++i) {
        if (d(i, i) == 0.0) {
            *result = Dmatrix<double>();
            return false;
        }
        reciprocal(i, i) = 1.0 / d(i, i);
    }
    result->swap(reciprocal);
    return true;
}

Dmatrix<double> inverseWithThrow(const Dmatrix<double>& d) {
    Dmatrix<double> result;
    if (!inverse(d, &result)) throw MatrixSingular();
    return result;
}

void KTimesColumn(Smatrix<double>& s, double k, int col, int count) {
    checkProductCount(count, s.rowCount());
    checkColumn(col, s.rowCount());
    for (int row = 0; row < count; ++row) s(row, col) = k * s(row, col);
}

void KTimesColumnPlusColumn(Smatrix<double>& s, double k, int src, int dst, int count) {
    checkProductCount(count, s.rowCount());
    checkColumn(src, s.rowCount());
    checkColumn(dst, s.rowCount());
    for (int row = 0; row < count; ++row) s(row, dst) = s(row, dst) + k * s(row, src);
}

void KTimesColumnPlusVector(const UTmatrix<double>& u, double k, int col, std::vector<double>& v,
                            int count) {
    checkProductCount(count, u.rowCount());
    checkColumn(col, u.rowCount());
    checkVectorLength(v, count);
    for (int row = 0; row < count; ++row) {
        v[static_cast<std::size_t>(row)] = v[static_cast<std::size_t>(row)] + k * u(row, col);
    }
}

void KTimesColumnPlusVector(const matrix<double>& a, double k, int col, std::vector<double>& v,
                            int count) {
    checkProductCount(count, a.rowCount());
    checkColumn(col, a.colCount());
    checkVectorLength(v, count);
    for (int row = 0; row < count; ++row) {
        v[static_cast<std::size_t>(row)] = v[static_cast<std::size_t>(row)] + k * a(row, col);
    }
}

double mQuadraticForm(const matrix<double>& a, const std::vector<double>& x) {
    if (a.rowCount() != a.colCount()) {
        throw MatrixException("matrix::quadratic form is only defined for square matrices");
    }
    return quadraticForm(a, x);
}

double mQuadraticForm(const Smatrix<double>& a, const std::vector<double>& x) {
    return quadraticForm(a, x);
}

}  // namespace vek::matrix_library
