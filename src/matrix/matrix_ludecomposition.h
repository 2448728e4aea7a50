// LU decomposition of a general square dense matrix with implicit (scaled) partial pivoting in
// Crout's arrangement, with its solves, inverse and determinant (Press, Teukolsky, Vetterling &
// Flannery, Numerical Recipes, 2nd ed., 1992, section 2.3, ludcmp and lubksb).
//
// Departure from that source: where it replaces a zero pivot by a tiny number and carries on,
// the decomposition here declares the matrix singular. A row maximum or a pivot counts as zero
// when it is within 4e-12 of zero (absolute, or relative to itself); a 1 x 1 matrix is singular
// only when its element is exactly 0. A singular decomposition keeps no factors, and every later
// operation reports it by its result (false, 0.0 or an emptied output) rather than by throwing.
#ifndef KELSTAT_MATRIX_MATRIX_LUDECOMPOSITION_H
#define KELSTAT_MATRIX_MATRIX_LUDECOMPOSITION_H

#include <cstdint>
#include <vector>

#include "matrix/matrix_new.h"

namespace vek::matrix_library {

class LUDecomposition {
  public:
    // Decomposes a; a matrix that is not square throws MatrixException "LU Decomp is defined for
    // only square matrices".
    explicit LUDecomposition(const matrix<double>& a);

    // Parity times the product of U's diagonal; 0.0 and false when singular.
    bool Determinant(double* result) const;
    // Solves A x = b; false with x emptied when singular. b needs one element per row (else
    // MatrixException).
    bool Solve(const std::vector<double>& b, std::vector<double>* x) const;
    // Solves A X = B column by column; false with X emptied (0 x 0) when singular. X must not be B.
    bool Solve(const matrix<double>& B, matrix<double>* X) const;
    // A^-1; false with the result emptied when singular.
    bool Inverse(matrix<double>* result) const;

    bool isSingular() const { return singular_; }
    // L below the diagonal (unit diagonal not stored) and U on and above it, for the row-permuted
    // matrix; 0 x 0 when singular.
    const matrix<double>& factors() const { return factors_; }
    // index()[j]: the row interchanged with row j at step j.
    const std::vector<std::int32_t>& index() const { return index_; }
    // +1 or -1: the sign of the row permutation.
    double parity() const { return parity_; }

  private:
    // Solves in place for one right-hand side held in x.
    void backSubstitute(std::vector<double>* x) const;

    matrix<double> factors_;
    bool singular_ = false;
    std::vector<std::int32_t> index_;
    double parity_ = 1.0;
};

// The same decomposition as a free function: returns the combined factors (0 x 0 when singular)
// and fills index and parity.
template <class T>
matrix<T> LUDecompSafeIterator(matrix<T> a, std::vector<int>& index, double& parity);

extern template matrix<double> LUDecompSafeIterator(matrix<double> a, std::vector<int>& index,
                                                    double& parity);

// One-call forms through LUDecomposition: false (or MatrixSingular "Matrix is singular" from the
// throwing forms) when a is singular.
bool inverse(const matrix<double>& a, matrix<double>* result);
bool determinant(const matrix<double>& a, double* result);
matrix<double> inverseWithThrow(const matrix<double>& a);
double determinantWithThrow(const matrix<double>& a);

}  // namespace vek::matrix_library

#endif  // KELSTAT_MATRIX_MATRIX_LUDECOMPOSITION_H
