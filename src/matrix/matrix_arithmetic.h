// Arithmetic over the four matrix kinds: sums, differences and products of every pair, products
// with scalars and vectors, column dot products, quadratic forms and the transposed products.
//
// Result kinds keep structure exactly where it must survive: a sum is symmetric, upper
// triangular or diagonal only when both operands are at least that; a product is upper
// triangular when both factors are upper triangular or diagonal, and diagonal only for two
// diagonal factors. Everything else is dense.
//
// Every operator checks shapes before it computes and throws MatrixException:
//  - sums and differences: "<name> : row counts are different", then "<name> : col counts are
//    different", where <name> is "matrix addition" for dense and symmetric results, "upper matrix
//    element wise op" for upper triangular ones and "diagonal matrix elementwise op" for two
//    diagonal matrices;
//  - products: "Matrix multiplication: incompatible orders" unless the left operand's columns
//    match the right operand's rows.
// Element-wise operations and SlowMatrixMultiply have a fixed order of operations; the other
// products accumulate in tiles and agree with them up to rounding.
#ifndef KELSTAT_MATRIX_MATRIX_ARITHMETIC_H
#define KELSTAT_MATRIX_MATRIX_ARITHMETIC_H

#include <vector>

#include "matrix/matrix_new.h"

namespace vek::matrix_library {

using DenseMatrix = matrix<double>;
using SymmetricMatrix = Smatrix<double>;
using UpperMatrix = UTmatrix<double>;
using DiagonalMatrix = Dmatrix<double>;
using Vector = std::vector<double>;

// ---- Sums ----------------------------------------------------------------------------------
DenseMatrix operator+(const DenseMatrix& a, const DenseMatrix& b);
DenseMatrix operator+(const DenseMatrix& a, const SymmetricMatrix& b);
DenseMatrix operator+(const DenseMatrix& a, const UpperMatrix& b);
DenseMatrix operator+(const DenseMatrix& a, const DiagonalMatrix& b);
DenseMatrix operator+(const SymmetricMatrix& a, const DenseMatrix& b);
SymmetricMatrix operator+(const SymmetricMatrix& a, const SymmetricMatrix& b);
DenseMatrix operator+(const SymmetricMatrix& a, const UpperMatrix& b);
SymmetricMatrix operator+(const SymmetricMatrix& a, const DiagonalMatrix& b);
DenseMatrix operator+(const UpperMatrix& a, const DenseMatrix& b);
DenseMatrix operator+(const UpperMatrix& a, const SymmetricMatrix& b);
UpperMatrix operator+(const UpperMatrix& a, const UpperMatrix& b);
UpperMatrix operator+(const UpperMatrix& a, const DiagonalMatrix& b);
DenseMatrix operator+(const DiagonalMatrix& a, const DenseMatrix& b);
SymmetricMatrix operator+(const DiagonalMatrix& a, const SymmetricMatrix& b);
UpperMatrix operator+(const DiagonalMatrix& a, const UpperMatrix& b);
DiagonalMatrix operator+(const DiagonalMatrix& a, const DiagonalMatrix& b);

// ---- Differences (same kinds and messages as the sums) ---------------------------------------
DenseMatrix operator-(const DenseMatrix& a, const DenseMatrix& b);
DenseMatrix operator-(const DenseMatrix& a, const SymmetricMatrix& b);
DenseMatrix operator-(const DenseMatrix& a, const UpperMatrix& b);
DenseMatrix operator-(const DenseMatrix& a, const DiagonalMatrix& b);
DenseMatrix operator-(const SymmetricMatrix& a, const DenseMatrix& b);
SymmetricMatrix operator-(const SymmetricMatrix& a, const SymmetricMatrix& b);
DenseMatrix operator-(const SymmetricMatrix& a, const UpperMatrix& b);
SymmetricMatrix operator-(const SymmetricMatrix& a, const DiagonalMatrix& b);
DenseMatrix operator-(const UpperMatrix& a, const DenseMatrix& b);
DenseMatrix operator-(const UpperMatrix& a, const SymmetricMatrix& b);
UpperMatrix operator-(const UpperMatrix& a, const UpperMatrix& b);
UpperMatrix operator-(const UpperMatrix& a, const DiagonalMatrix& b);
DenseMatrix operator-(const DiagonalMatrix& a, const DenseMatrix& b);
SymmetricMatrix operator-(const DiagonalMatrix& a, const SymmetricMatrix& b);
UpperMatrix operator-(const DiagonalMatrix& a, const UpperMatrix& b);
DiagonalMatrix operator-(const DiagonalMatrix& a, const DiagonalMatrix& b);

// A diagonal matrix added to (subtracted from) a dense one in place; a shape mismatch throws
// "matrix += diagonal : row counts are different" (or "col counts").
DenseMatrix& operator+=(DenseMatrix& a, const DiagonalMatrix& b);
DenseMatrix& operator-=(DenseMatrix& a, const DiagonalMatrix& b);

// ---- Products ------------------------------------------------------------------------------
// Dense by dense: accumulated in 8 x 8 x 8 tiles for locality.
DenseMatrix operator*(const DenseMatrix& a, const DenseMatrix& b);
DenseMatrix operator*(const DenseMatrix& a, const SymmetricMatrix& b);
DenseMatrix operator*(const DenseMatrix& a, const UpperMatrix& b);
DenseMatrix operator*(const DenseMatrix& a, const DiagonalMatrix& b);
DenseMatrix operator*(const SymmetricMatrix& a, const DenseMatrix& b);
DenseMatrix operator*(const SymmetricMatrix& a, const SymmetricMatrix& b);
DenseMatrix operator*(const SymmetricMatrix& a, const UpperMatrix& b);
DenseMatrix operator*(const SymmetricMatrix& a, const DiagonalMatrix& b);
DenseMatrix operator*(const UpperMatrix& a, const DenseMatrix& b);
DenseMatrix operator*(const UpperMatrix& a, const SymmetricMatrix& b);
UpperMatrix operator*(const UpperMatrix& a, const UpperMatrix& b);
UpperMatrix operator*(const UpperMatrix& a, const DiagonalMatrix& b);
DenseMatrix operator*(const DiagonalMatrix& a, const DenseMatrix& b);
DenseMatrix operator*(const DiagonalMatrix& a, const SymmetricMatrix& b);
UpperMatrix operator*(const DiagonalMatrix& a, const UpperMatrix& b);
// The element-wise product of the diagonals; the orders are checked as for any product and
// then as an element-wise operation ("diagonal matrix elementwise op").
DiagonalMatrix operator*(const DiagonalMatrix& a, const DiagonalMatrix& b);

// a = a * b (b may be a itself).
DenseMatrix& operator*=(DenseMatrix& a, const DenseMatrix& b);
DiagonalMatrix& operator*=(DiagonalMatrix& a, const DiagonalMatrix& b);

// The plain triple loop: element (i, j) sums a(i, k) * b(k, j) for k = 0, 1, ... in order.
DenseMatrix SlowMatrixMultiply(const DenseMatrix& a, const DenseMatrix& b);

// result = a' b, resized to (columns of a) x (columns of b); the transpose is never formed.
// b must have as many rows as a, else "Matrix multiplication: incompatible orders".
void multiplyLeftTranspose(const DenseMatrix& a, const DenseMatrix& b, DenseMatrix& result);
// result = a b', resized to (rows of a) x (rows of b); b must have as many columns as a.
void multiplyRightTranspose(const DenseMatrix& a, const DenseMatrix& b, DenseMatrix& result);

// ---- Scalars (dense times scalar is a member of matrix) ------------------------------------
DenseMatrix operator*(double factor, const DenseMatrix& a);
SymmetricMatrix operator*(double factor, const SymmetricMatrix& a);
SymmetricMatrix operator*(const SymmetricMatrix& a, double factor);
UpperMatrix operator*(double factor, const UpperMatrix& a);
UpperMatrix operator*(const UpperMatrix& a, double factor);
DiagonalMatrix operator*(double factor, const DiagonalMatrix& a);
DiagonalMatrix operator*(const DiagonalMatrix& a, double factor);

// ---- Vectors -------------------------------------------------------------------------------
// a x as a column vector (rows x 1); x needs one element per column, else "matrix and vector
// must be of same order".
DenseMatrix operator*(const DenseMatrix& a, const Vector& x);
DenseMatrix operator*(const SymmetricMatrix& a, const Vector& x);
// a = a x.
DenseMatrix& operator*=(DenseMatrix& a, const Vector& x);
// a must be a column vector of x's length, else "op+= matrix and vector must be of same order"
// ("op-= ..." for the difference).
DenseMatrix& operator+=(DenseMatrix& a, const Vector& x);
DenseMatrix& operator-=(DenseMatrix& a, const Vector& x);
DenseMatrix operator+(const DenseMatrix& a, const Vector& x);
DenseMatrix operator+(const Vector& x, const DenseMatrix& a);
DenseMatrix operator-(const DenseMatrix& a, const Vector& x);

// ---- Dot products and quadratic forms ------------------------------------------------------
// Sum of a(r, colA) * a(r, colB) over the first count rows. count beyond the row count throws
// "matrix::number of products greater than dimension"; count 0 gives 0.
double DotProduct(const DenseMatrix& a, int colA, int colB, int count);
// Sum of a(r, col) * v[r] over the first count rows, with the same check.
double DotProduct(const DenseMatrix& a, int col, const Vector& v, int count);

// r' (b a b')^-1 r with r = b x - y: the weighted norm of a residual. b a b' must be symmetric
// (within the tolerance of matrix::ConvertToSmatrix) and positive definite, else MatrixSingular.
// A dense a must be square ("matrix::quadratic form is only defined for square matrices").
double mQuadraticForm(const DenseMatrix& a, const DenseMatrix& b, const Vector& x, const Vector& y);
double mQuadraticForm(const SymmetricMatrix& a, const DenseMatrix& b, const Vector& x,
                      const Vector& y);

}  // namespace vek::matrix_library

#endif  // KELSTAT_MATRIX_MATRIX_ARITHMETIC_H
