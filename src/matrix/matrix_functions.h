// Free functions of the matrix library: conversions between the packed kinds, the Cholesky
// factorisation of symmetric positive definite matrices with its solve and inverse, diagonal
// inverses, and the fuzzy comparison used by the eigen-system iteration.
#ifndef KELSTAT_MATRIX_MATRIX_FUNCTIONS_H
#define KELSTAT_MATRIX_MATRIX_FUNCTIONS_H

#include <algorithm>
#include <cmath>
#include <vector>

#include "matrix/matrix_new.h"

namespace vek::matrix_library {

// U(i, j) = s(i, j) for i <= j.
UTmatrix<double> SmatrixToUTmatrix(const Smatrix<double>& s);
// The symmetric matrix whose upper triangle is u.
Smatrix<double> mUTmatrixToSmatrix(const UTmatrix<double>& u);

// Empties out, then appends the rows (byRows) or the columns from index start on, each in order.
// A negative start throws MatrixException.
void mFlattenmatrix(const matrix<double>& a, std::vector<double>& out, int start, bool byRows);
void mFlattenmatrix(const Smatrix<double>& a, std::vector<double>& out, int start, bool byRows);

// Cholesky factor A = R'R by columns, continuing a factor whose rows before `start` are done:
// columns start..n-1 of the copy of u are factored in place. On success *failIndex = -1 and
// *pivot is the last column's squared diagonal; when a column's pivot d is not positive,
// *failIndex is that column, *pivot = |d| and the partly factored copy comes back. A NaN pivot
// is not detected. start > n or start < 0 throws MatrixException; either pointer may be null.
UTmatrix<double> CholeskyDecomp(const UTmatrix<double>& u, int start, int* failIndex,
                                double* pivot);
// Factor of a into *factor; false, with *factor emptied, when a is not positive definite.
bool CholeskyDecomp(const Smatrix<double>& a, UTmatrix<double>* factor);
// As above; throws MatrixSingular instead of returning false.
UTmatrix<double> CholeskyDecompWithThrow(const Smatrix<double>& a);
// Solves R'R x = b.
std::vector<double> CholeskyBackSub(const UTmatrix<double>& r, const std::vector<double>& b);
// (R'R)^-1 by LINPACK's DPODI column scheme (Dongarra et al., LINPACK Users' Guide, 1979), carried
// out in packed symmetric storage.
Smatrix<double> CholeskyInverse(const UTmatrix<double>& r);
// Inverse of a symmetric positive definite matrix through its Cholesky factor; false, with
// *result emptied, when there is none.
bool inverse(const Smatrix<double>& a, Smatrix<double>* result);
Smatrix<double> inverseWithThrow(const Smatrix<double>& a);
// Element-wise reciprocal; a diagonal element exactly 0 makes the matrix singular.
bool inverse(const Dmatrix<double>& d, Dmatrix<double>* result);
Dmatrix<double> inverseWithThrow(const Dmatrix<double>& d);

// Column primitives over the first `count` rows; count beyond the order throws MatrixException,
// as does a column outside the matrix or a vector shorter than count.
// s(r, col) = k * s(r, col).
void KTimesColumn(Smatrix<double>& s, double k, int col, int count);
// s(r, dst) = s(r, dst) + k * s(r, src).
void KTimesColumnPlusColumn(Smatrix<double>& s, double k, int src, int dst, int count);
// v[r] = v[r] + k * u(r, col).
void KTimesColumnPlusVector(const UTmatrix<double>& u, double k, int col, std::vector<double>& v,
                            int count);
void KTimesColumnPlusVector(const matrix<double>& a, double k, int col, std::vector<double>& v,
                            int count);

// x' A x, as the dot product of x with A x. A dense a must be square ("matrix::quadratic form is
// only defined for square matrices") and x must have one element per row ("matrix::matrix and
// vector have incompatible dimensions"); order 0 gives 0.
double mQuadraticForm(const matrix<double>& a, const std::vector<double>& x);
double mQuadraticForm(const Smatrix<double>& a, const std::vector<double>& x);

// Three-way comparison within a relative tolerance: 0 when |a - b| <= relativeTolerance *
// max(|a|, |b|), else +1 when b is not greater than a (also for NaN) and -1 when it is. The third
// argument is not used.
// Inline: the eigen-system iteration calls it several times per rotation.
inline int mCompareWithFuzz(double a, double b, double /*unused*/, double relativeTolerance) {
    if (std::fabs(a - b) <= relativeTolerance * std::max(std::fabs(a), std::fabs(b))) return 0;
    return b > a ? -1 : 1;
}
// |a| carrying the sign bit of b (-0.0 counts as negative).
inline double mTransferSign(double a, double b) {
    return std::copysign(std::fabs(a), b);
}

}  // namespace vek::matrix_library

#endif  // KELSTAT_MATRIX_MATRIX_FUNCTIONS_H
