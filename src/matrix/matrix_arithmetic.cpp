#include "matrix/matrix_arithmetic.h"

#include <algorithm>
#include <cstddef>
#include <functional>
#include <string>
#include <type_traits>

#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_functions.h"

namespace vek::matrix_library {

namespace {

// Operation names that open the shape-mismatch messages of the element-wise operators.
constexpr char kAdditionName[] = "matrix addition";
constexpr char kUpperElementwiseName[] = "upper matrix element wise op";
constexpr char kDiagonalElementwiseName[] = "diagonal matrix elementwise op";
constexpr char kAddDiagonalInPlaceName[] = "matrix += diagonal";

constexpr char kIncompatibleOrders[] = "Matrix multiplication: incompatible orders";
constexpr char kMatrixVectorOrder[] = "matrix and vector must be of same order";

// Edge of the square tiles of the dense product: 8 x 8 doubles of each operand stay in cache
// while a tile of the result is accumulated.
constexpr int kTile = 8;

template <class A, class B>
void checkSameShape(const A& a, const B& b, const char* operation) {
    if (a.rowCount() != b.rowCount()) {
        throw MatrixException(std::string(operation) + " : row counts are different");
    }
    if (a.colCount() != b.colCount()) {
        throw MatrixException(std::string(operation) + " : col counts are different");
    }
}

template <class A, class B>
void checkInnerOrders(const A& a, const B& b) {
    if (a.colCount() != b.rowCount()) throw MatrixException(kIncompatibleOrders);
}

void checkColumnIndex(int column, const DenseMatrix& a) {
    if (column < 0 || column >= a.colCount()) {
        throw MatrixException("matrix: column index out of range");
    }
}

void checkProductCount(int count, const DenseMatrix& a) {
    if (count > a.rowCount()) {
        throw MatrixException("matrix::number of products greater than dimension");
    }
}

std::size_t toIndex(int index) {
    return static_cast<std::size_t>(index);
}

// A zero matrix of the given kind and shape (the square kinds take the row count as order).
template <class Result>
Result zeroMatrix(int rows, int cols) {
    if constexpr (std::is_same_v<Result, DenseMatrix>) {
        return Result(rows, cols, 0.0);
    } else {
        static_cast<void>(cols);
        return Result(rows, 0.0);
    }
}

// Calls visit(i, j) for every position the kind stores: all of a dense matrix, the lower
// triangle of a symmetric one, the upper triangle of a triangular one, the diagonal.
template <class Result, class Visit>
void forEachStored(const Result& r, Visit visit) {
    const int rows = r.rowCount();
    const int cols = r.colCount();
    for (int i = 0; i < rows; ++i) {
        if constexpr (std::is_same_v<Result, DenseMatrix>) {
            for (int j = 0; j < cols; ++j) visit(i, j);
        } else if constexpr (std::is_same_v<Result, SymmetricMatrix>) {
            for (int j = 0; j <= i; ++j) visit(i, j);
        } else if constexpr (std::is_same_v<Result, UpperMatrix>) {
            for (int j = i; j < cols; ++j) visit(i, j);
        } else {
            visit(i, i);
        }
    }
}

// r(i, j) = op(a(i, j), b(i, j)) over the positions of the result kind; the positions it does not
// store are zero (or mirrored) in both operands.
template <class Result, class A, class B, class Op>
Result elementwise(const A& a, const B& b, const char* operation, Op op) {
    checkSameShape(a, b, operation);
    Result r = zeroMatrix<Result>(a.rowCount(), a.colCount());
    forEachStored(r, [&](int i, int j) { r(i, j) = op(a(i, j), b(i, j)); });
    return r;
}

template <class Result, class A>
Result scaled(double factor, const A& a) {
    Result r = zeroMatrix<Result>(a.rowCount(), a.colCount());
    forEachStored(r, [&](int i, int j) { r(i, j) = factor * a(i, j); });
    return r;
}

// Adds to r(i, colTile + c), c < width, the partial dot products of row i of a with those columns
// of b over the inner indexes [innerBegin, innerEnd). FixedWidth is the width when it is known at
// compile time (a full tile: the partial sums then live in registers), else 0.
template <int FixedWidth>
void addTileRow(const DenseMatrix& a, const DenseMatrix& b, int i, int colTile, int innerBegin,
                int innerEnd, DenseMatrix& r) {
    const int width = FixedWidth > 0 ? FixedWidth : std::min(kTile, b.colCount() - colTile);
    double partial[kTile] = {};
    for (int k = innerBegin; k < innerEnd; ++k) {
        const double left = a(i, k);
        const double* rightRow = &b(k, colTile);
        // Fully unrolled for a full tile, so that the partial sums stay in registers.
#pragma GCC unroll 8
        for (int c = 0; c < width; ++c) partial[c] += left * rightRow[c];
    }
    double* resultRow = &r(i, colTile);
    for (int c = 0; c < width; ++c) resultRow[c] += partial[c];
}

// Tiles of kTile rows x kTile columns x kTile inner indexes; every result element of a tile adds
// the partial dot product over the inner tile. Edge tiles are cut to the matrix. The partial sums
// of one result row run side by side, so both operands are read along their rows.
DenseMatrix tiledProduct(const DenseMatrix& a, const DenseMatrix& b) {
    checkInnerOrders(a, b);
    const int rows = a.rowCount();
    const int inner = a.colCount();
    const int cols = b.colCount();
    DenseMatrix r(rows, cols, 0.0);
    for (int rowTile = 0; rowTile < rows; rowTile += kTile) {
        const int rowEnd = std::min(rowTile + kTile, rows);
        for (int colTile = 0; colTile < cols; colTile += kTile) {
            const int width = std::min(kTile, cols - colTile);
            for (int innerTile = 0; innerTile < inner; innerTile += kTile) {
                const int innerEnd = std::min(innerTile + kTile, inner);
                for (int i = rowTile; i < rowEnd; ++i) {
                    if (width == kTile) {
                        addTileRow<kTile>(a, b, i, colTile, innerTile, innerEnd, r);
                    } else {
                        addTileRow<0>(a, b, i, colTile, innerTile, innerEnd, r);
                    }
                }
            }
        }
    }
    return r;
}

// d a: row i of a scaled by d(i).
template <class Result, class A>
Result diagonalTimes(const DiagonalMatrix& d, const A& a) {
    checkInnerOrders(d, a);
    Result r = zeroMatrix<Result>(a.rowCount(), a.colCount());
    forEachStored(r, [&](int i, int j) { r(i, j) = d(i, i) * a(i, j); });
    return r;
}

// a d: column j of a scaled by d(j).
template <class Result, class A>
Result timesDiagonal(const A& a, const DiagonalMatrix& d) {
    checkInnerOrders(a, d);
    Result r = zeroMatrix<Result>(a.rowCount(), a.colCount());
    forEachStored(r, [&](int i, int j) { r(i, j) = a(i, j) * d(j, j); });
    return r;
}

// Both factors go through their dense form; the tiled product does the work.
template <class A, class B>
DenseMatrix denseProduct(const A& a, const B& b) {
    checkInnerOrders(a, b);
    return tiledProduct(DenseMatrix(a), DenseMatrix(b));
}

template <class Square>
DenseMatrix squareTimesVector(const Square& a, const Vector& x) {
    if (x.size() != toIndex(a.colCount())) throw MatrixException(kMatrixVectorOrder);
    DenseMatrix r(a.rowCount(), 1, 0.0);
    for (int i = 0; i < a.rowCount(); ++i) {
        double sum = 0.0;
        for (int k = 0; k < a.colCount(); ++k) sum += a(i, k) * x[toIndex(k)];
        r(i, 0) = sum;
    }
    return r;
}

void checkColumnVectorOf(const DenseMatrix& a, const Vector& x, const char* message) {
    if (a.colCount() != 1 || toIndex(a.rowCount()) != x.size()) throw MatrixException(message);
}

double dot(const Vector& x, const Vector& y) {
    double sum = 0.0;
    for (std::size_t k = 0; k < x.size(); ++k) sum += x[k] * y[k];
    return sum;
}

template <class Square>
double residualQuadraticForm(const Square& a, const DenseMatrix& b, const Vector& x,
                             const Vector& y) {
    const Vector residual = (b * x - y).ConvertToVector();
    DenseMatrix weight;
    multiplyRightTranspose(b * a, b, weight);
    const UpperMatrix factor = CholeskyDecompWithThrow(weight.ConvertToSmatrix());
    return dot(residual, CholeskyBackSub(factor, residual));
}

}  // namespace

// ---- Sums and differences ------------------------------------------------------------------

DenseMatrix operator+(const DenseMatrix& a, const DenseMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::plus<double>());
}
DenseMatrix operator+(const DenseMatrix& a, const SymmetricMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::plus<double>());
}
DenseMatrix operator+(const DenseMatrix& a, const UpperMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::plus<double>());
}
DenseMatrix operator+(const DenseMatrix& a, const DiagonalMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::plus<double>());
}
DenseMatrix operator+(const SymmetricMatrix& a, const DenseMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::plus<double>());
}
SymmetricMatrix operator+(const SymmetricMatrix& a, const SymmetricMatrix& b) {
    return elementwise<SymmetricMatrix>(a, b, kAdditionName, std::plus<double>());
}
DenseMatrix operator+(const SymmetricMatrix& a, const UpperMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::plus<double>());
}
SymmetricMatrix operator+(const SymmetricMatrix& a, const DiagonalMatrix& b) {
    return elementwise<SymmetricMatrix>(a, b, kAdditionName, std::plus<double>());
}
DenseMatrix operator+(const UpperMatrix& a, const DenseMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::plus<double>());
}
DenseMatrix operator+(const UpperMatrix& a, const SymmetricMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::plus<double>());
}
UpperMatrix operator+(const UpperMatrix& a, const UpperMatrix& b) {
    return elementwise<UpperMatrix>(a, b, kUpperElementwiseName, std::plus<double>());
}
UpperMatrix operator+(const UpperMatrix& a, const DiagonalMatrix& b) {
    return elementwise<UpperMatrix>(a, b, kUpperElementwiseName, std::plus<double>());
}
DenseMatrix operator+(const DiagonalMatrix& a, const DenseMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::plus<double>());
}
SymmetricMatrix operator+(const DiagonalMatrix& a, const SymmetricMatrix& b) {
    return elementwise<SymmetricMatrix>(a, b, kAdditionName, std::plus<double>());
}
UpperMatrix operator+(const DiagonalMatrix& a, const UpperMatrix& b) {
    return elementwise<UpperMatrix>(a, b, kUpperElementwiseName, std::plus<double>());
}
DiagonalMatrix operator+(const DiagonalMatrix& a, const DiagonalMatrix& b) {
    return elementwise<DiagonalMatrix>(a, b, kDiagonalElementwiseName, std::plus<double>());
}
DenseMatrix operator-(const DenseMatrix& a, const DenseMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::minus<double>());
}
DenseMatrix operator-(const DenseMatrix& a, const SymmetricMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::minus<double>());
}
DenseMatrix operator-(const DenseMatrix& a, const UpperMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::minus<double>());
}
DenseMatrix operator-(const DenseMatrix& a, const DiagonalMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::minus<double>());
}
DenseMatrix operator-(const SymmetricMatrix& a, const DenseMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::minus<double>());
}
SymmetricMatrix operator-(const SymmetricMatrix& a, const SymmetricMatrix& b) {
    return elementwise<SymmetricMatrix>(a, b, kAdditionName, std::minus<double>());
}
DenseMatrix operator-(const SymmetricMatrix& a, const UpperMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::minus<double>());
}
SymmetricMatrix operator-(const SymmetricMatrix& a, const DiagonalMatrix& b) {
    return elementwise<SymmetricMatrix>(a, b, kAdditionName, std::minus<double>());
}
DenseMatrix operator-(const UpperMatrix& a, const DenseMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::minus<double>());
}
DenseMatrix operator-(const UpperMatrix& a, const SymmetricMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::minus<double>());
}
UpperMatrix operator-(const UpperMatrix& a, const UpperMatrix& b) {
    return elementwise<UpperMatrix>(a, b, kUpperElementwiseName, std::minus<double>());
}
UpperMatrix operator-(const UpperMatrix& a, const DiagonalMatrix& b) {
    return elementwise<UpperMatrix>(a, b, kUpperElementwiseName, std::minus<double>());
}
DenseMatrix operator-(const DiagonalMatrix& a, const DenseMatrix& b) {
    return elementwise<DenseMatrix>(a, b, kAdditionName, std::minus<double>());
}
SymmetricMatrix operator-(const DiagonalMatrix& a, const SymmetricMatrix& b) {
    return elementwise<SymmetricMatrix>(a, b, kAdditionName, std::minus<double>());
}
UpperMatrix operator-(const DiagonalMatrix& a, const UpperMatrix& b) {
    return elementwise<UpperMatrix>(a, b, kUpperElementwiseName, std::minus<double>());
}
DiagonalMatrix operator-(const DiagonalMatrix& a, const DiagonalMatrix& b) {
    return elementwise<DiagonalMatrix>(a, b, kDiagonalElementwiseName, std::minus<double>());
}

DenseMatrix& operator+=(DenseMatrix& a, const DiagonalMatrix& b) {
    checkSameShape(a, b, kAddDiagonalInPlaceName);
    for (int i = 0; i < b.rowCount(); ++i) a(i, i) += b(i, i);
    return a;
}

DenseMatrix& operator-=(DenseMatrix& a, const DiagonalMatrix& b) {
    checkSameShape(a, b, kAddDiagonalInPlaceName);
    for (int i = 0; i < b.rowCount(); ++i) a(i, i) -= b(i, i);
    return a;
}

// ---- Products ------------------------------------------------------------------------------

DenseMatrix operator*(const DenseMatrix& a, const DenseMatrix& b) {
    return tiledProduct(a, b);
}
DenseMatrix operator*(const DenseMatrix& a, const SymmetricMatrix& b) {
    return denseProduct(a, b);
}
DenseMatrix operator*(const DenseMatrix& a, const UpperMatrix& b) {
    return denseProduct(a, b);
}
DenseMatrix operator*(const DenseMatrix& a, const DiagonalMatrix& b) {
    return timesDiagonal<DenseMatrix>(a, b);
}
DenseMatrix operator*(const SymmetricMatrix& a, const DenseMatrix& b) {
    return denseProduct(a, b);
}
DenseMatrix operator*(const SymmetricMatrix& a, const SymmetricMatrix& b) {
    return denseProduct(a, b);
}
DenseMatrix operator*(const SymmetricMatrix& a, const UpperMatrix& b) {
    return denseProduct(a, b);
}
DenseMatrix operator*(const SymmetricMatrix& a, const DiagonalMatrix& b) {
    return timesDiagonal<DenseMatrix>(a, b);
}
DenseMatrix operator*(const UpperMatrix& a, const DenseMatrix& b) {
    return denseProduct(a, b);
}
DenseMatrix operator*(const UpperMatrix& a, const SymmetricMatrix& b) {
    return denseProduct(a, b);
}

// Only k from i to j contributes to element (i, j) of a product of two upper triangles.
UpperMatrix operator*(const UpperMatrix& a, const UpperMatrix& b) {
    checkInnerOrders(a, b);
    UpperMatrix r(a.rowCount(), 0.0);
    forEachStored(r, [&](int i, int j) {
        double sum = 0.0;
        for (int k = i; k <= j; ++k) sum += a(i, k) * b(k, j);
        r(i, j) = sum;
    });
    return r;
}

UpperMatrix operator*(const UpperMatrix& a, const DiagonalMatrix& b) {
    return timesDiagonal<UpperMatrix>(a, b);
}
DenseMatrix operator*(const DiagonalMatrix& a, const DenseMatrix& b) {
    return diagonalTimes<DenseMatrix>(a, b);
}
DenseMatrix operator*(const DiagonalMatrix& a, const SymmetricMatrix& b) {
    return diagonalTimes<DenseMatrix>(a, b);
}
UpperMatrix operator*(const DiagonalMatrix& a, const UpperMatrix& b) {
    return diagonalTimes<UpperMatrix>(a, b);
}

DiagonalMatrix operator*(const DiagonalMatrix& a, const DiagonalMatrix& b) {
    checkInnerOrders(a, b);
    return elementwise<DiagonalMatrix>(a, b, kDiagonalElementwiseName, std::multiplies<double>());
}

DenseMatrix& operator*=(DenseMatrix& a, const DenseMatrix& b) {
    DenseMatrix product = a * b;
    a.swap(product);
    return a;
}

DiagonalMatrix& operator*=(DiagonalMatrix& a, const DiagonalMatrix& b) {
    checkInnerOrders(a, b);
    for (int i = 0; i < a.rowCount(); ++i) a(i, i) *= b(i, i);
    return a;
}

DenseMatrix SlowMatrixMultiply(const DenseMatrix& a, const DenseMatrix& b) {
    checkInnerOrders(a, b);
    DenseMatrix r(a.rowCount(), b.colCount(), 0.0);
    for (int i = 0; i < a.rowCount(); ++i) {
        for (int j = 0; j < b.colCount(); ++j) {
            double sum = 0.0;
            for (int k = 0; k < a.colCount(); ++k) sum += a(i, k) * b(k, j);
            r(i, j) = sum;
        }
    }
    return r;
}

void multiplyLeftTranspose(const DenseMatrix& a, const DenseMatrix& b, DenseMatrix& result) {
    if (a.rowCount() != b.rowCount()) throw MatrixException(kIncompatibleOrders);
    DenseMatrix r(a.colCount(), b.colCount(), 0.0);
    // Running down the shared rows keeps both operands' accesses sequential.
    for (int k = 0; k < a.rowCount(); ++k) {
        for (int i = 0; i < a.colCount(); ++i) {
            const double left = a(k, i);
            for (int j = 0; j < b.colCount(); ++j) r(i, j) += left * b(k, j);
        }
    }
    result.swap(r);
}

void multiplyRightTranspose(const DenseMatrix& a, const DenseMatrix& b, DenseMatrix& result) {
    if (a.colCount() != b.colCount()) throw MatrixException(kIncompatibleOrders);
    DenseMatrix r(a.rowCount(), b.rowCount(), 0.0);
    for (int i = 0; i < a.rowCount(); ++i) {
        for (int j = 0; j < b.rowCount(); ++j) {
            double sum = 0.0;
            for (int k = 0; k < a.colCount(); ++k) sum += a(i, k) * b(j, k);
            r(i, j) = sum;
        }
    }
    result.swap(r);
}

// ---- Scalars -------------------------------------------------------------------------------

DenseMatrix operator*(double factor, const DenseMatrix& a) {
    return scaled<DenseMatrix>(factor, a);
}
SymmetricMatrix operator*(double factor, const SymmetricMatrix& a) {
    return scaled<SymmetricMatrix>(factor, a);
}
SymmetricMatrix operator*(const SymmetricMatrix& a, double factor) {
    return scaled<SymmetricMatrix>(factor, a);
}
UpperMatrix operator*(double factor, const UpperMatrix& a) {
    return scaled<UpperMatrix>(factor, a);
}
UpperMatrix operator*(const UpperMatrix& a, double factor) {
    return scaled<UpperMatrix>(factor, a);
}
DiagonalMatrix operator*(double factor, const DiagonalMatrix& a) {
    return scaled<DiagonalMatrix>(factor, a);
}
DiagonalMatrix operator*(const DiagonalMatrix& a, double factor) {
    return scaled<DiagonalMatrix>(factor, a);
}

// ---- Vectors -------------------------------------------------------------------------------

DenseMatrix operator*(const DenseMatrix& a, const Vector& x) {
    return squareTimesVector(a, x);
}
DenseMatrix operator*(const SymmetricMatrix& a, const Vector& x) {
    return squareTimesVector(a, x);
}

DenseMatrix& operator*=(DenseMatrix& a, const Vector& x) {
    DenseMatrix product = a * x;
    a.swap(product);
    return a;
}

DenseMatrix& operator+=(DenseMatrix& a, const Vector& x) {
    checkColumnVectorOf(a, x, "op+= matrix and vector must be of same order");
    for (int i = 0; i < a.rowCount(); ++i) a(i, 0) += x[toIndex(i)];
    return a;
}

DenseMatrix& operator-=(DenseMatrix& a, const Vector& x) {
    checkColumnVectorOf(a, x, "op-= matrix and vector must be of same order");
    for (int i = 0; i < a.rowCount(); ++i) a(i, 0) -= x[toIndex(i)];
    return a;
}

DenseMatrix operator+(const DenseMatrix& a, const Vector& x) {
    DenseMatrix r(a);
    return r += x;
}
DenseMatrix operator+(const Vector& x, const DenseMatrix& a) {
    DenseMatrix r(a);
    return r += x;
}
DenseMatrix operator-(const DenseMatrix& a, const Vector& x) {
    DenseMatrix r(a);
    return r -= x;
}

// ---- Dot products and quadratic forms ------------------------------------------------------

double DotProduct(const DenseMatrix& a, int colA, int colB, int count) {
    checkProductCount(count, a);
    if (count <= 0) return 0.0;
    checkColumnIndex(colA, a);
    checkColumnIndex(colB, a);
    double sum = 0.0;
    for (int r = 0; r < count; ++r) sum += a(r, colA) * a(r, colB);
    return sum;
}

double DotProduct(const DenseMatrix& a, int col, const Vector& v, int count) {
    checkProductCount(count, a);
    if (count <= 0) return 0.0;
    checkColumnIndex(col, a);
    if (v.size() < toIndex(count)) {
        throw MatrixException("matrix: vector shorter than the number of products");
    }
    double sum = 0.0;
    for (int r = 0; r < count; ++r) sum += a(r, col) * v[toIndex(r)];
    return sum;
}

double mQuadraticForm(const DenseMatrix& a, const DenseMatrix& b, const Vector& x,
                      const Vector& y) {
    if (a.rowCount() != a.colCount()) {
        throw MatrixException("matrix::quadratic form is only defined for square matrices");
    }
    return residualQuadraticForm(a, b, x, y);
}

double mQuadraticForm(const SymmetricMatrix& a, const DenseMatrix& b, const Vector& x,
                      const Vector& y) {
    return residualQuadraticForm(a, b, x, y);
}

}  // namespace vek::matrix_library
