// Eigenvalues and eigenvectors of a real symmetric matrix.
#ifndef KELSTAT_MATRIX_MATRIX_EIGENSYSTEM_H
#define KELSTAT_MATRIX_MATRIX_EIGENSYSTEM_H

#include <vector>

#include "matrix/matrix_new.h"

namespace vek::matrix_library {

// All eigenvalues (ascending) and unit eigenvectors (column i belongs to values[i]) of the
// symmetric matrix whose lower triangle, diagonal included, is that of a; the upper triangle is
// not read. Returns 0 on success, or the 1-based position of the first eigenvalue that did not
// settle within 30 QL iterations; the outputs are then unsorted and not to be used. A 0 x 0 input
// gives empty outputs and 0; a matrix that is not square throws MatrixException. Accuracy:
// |A v - lambda v| within a small multiple of n * 1e-16 * max |lambda|, and |V'V - I| within a
// small multiple of n * 1e-16, as for the published routines.
//
// Householder reduction to tridiagonal form with accumulated transformations (tred2, Press et al.,
// Numerical Recipes, 2nd ed., 1992, section 11.2), then the QL algorithm with explicit shifts in
// the 1972 form of EISPACK's tql2 (Bowdler, Martin, Reinsch and Wilkinson, Numer. Math. 11, 1968;
// Smith et al., EISPACK Guide, 1976), and an ascending sort. Departures from the sources:
// comparisons within a relative fuzz of 1e-12, tiny rotation terms flushed to zero, and a fuzzy
// zero test on the reduction's row scale and diagonal.
int mEigenSystemsIterator(const matrix<double>& a, std::vector<double>& values,
                          matrix<double>& vectors);

// The same for a square matrix a (asserted); vectors receives the eigenvector matrix also after
// a failure.
int EigenSystems(const matrix<double>& a, std::vector<double>& values, matrix<double>& vectors);

}  // namespace vek::matrix_library

#endif  // KELSTAT_MATRIX_MATRIX_EIGENSYSTEM_H
