// The checks of the matrix library with the condition texts and places their messages report.
// Included only by the library's own sources.
#ifndef KELSTAT_MATRIX_MATRIX_CHECK_SITES_H
#define KELSTAT_MATRIX_MATRIX_CHECK_SITES_H

#include "matrix/allege.h"

namespace vek::matrix_library::sites {

using allege::CheckSite;

inline constexpr char kMatrixNew[] = "src/matrix/matrix_new";
inline constexpr char kMatrixImpl[] = "src/matrix/matrix_impl";
inline constexpr char kSymmetricImpl[] = "src/matrix/matrix_symmetric_impl";
inline constexpr char kUpperImpl[] = "src/matrix/matrix_upper_impl";
inline constexpr char kMatrixFunctions[] = "src/matrix/matrix_functions";

inline constexpr char kRowInRange[] = "row >= 0 && row < m_";
inline constexpr char kDenseColumnInRange[] = "column >= 0 && column < n_";
inline constexpr char kSquareColumnInRange[] = "column >= 0 && column < m_";
inline constexpr char kSymmetricRowInRange[] = "i >= 0 && i < m_";
inline constexpr char kSymmetricColumnInRange[] = "j >= 0 && j < m_";
inline constexpr char kStorageMatchesShape[] = "mn_ == static_cast<int>( v_.size() )";

// Element access of the four kinds: writable, then const.
inline constexpr CheckSite kDenseAtRow{kRowInRange, kMatrixNew, 162};
inline constexpr CheckSite kDenseAtColumn{kDenseColumnInRange, kMatrixNew, 163};
inline constexpr CheckSite kDenseConstAtRow{kRowInRange, kMatrixNew, 170};
inline constexpr CheckSite kDenseConstAtColumn{kDenseColumnInRange, kMatrixNew, 171};
inline constexpr CheckSite kSymmetricAtRow{kSymmetricRowInRange, kMatrixNew, 443};
inline constexpr CheckSite kSymmetricAtColumn{kSymmetricColumnInRange, kMatrixNew, 444};
inline constexpr CheckSite kSymmetricConstAtRow{kSymmetricRowInRange, kMatrixNew, 451};
inline constexpr CheckSite kSymmetricConstAtColumn{kSymmetricColumnInRange, kMatrixNew, 452};
inline constexpr CheckSite kUpperAtRow{kRowInRange, kMatrixNew, 588};
inline constexpr CheckSite kUpperAtColumn{kSquareColumnInRange, kMatrixNew, 589};
inline constexpr CheckSite kUpperConstAtRow{kRowInRange, kMatrixNew, 597};
inline constexpr CheckSite kUpperConstAtColumn{kSquareColumnInRange, kMatrixNew, 598};
inline constexpr CheckSite kDiagonalAtRow{kRowInRange, kMatrixNew, 696};
inline constexpr CheckSite kDiagonalAtColumn{kSquareColumnInRange, kMatrixNew, 697};
inline constexpr CheckSite kDiagonalConstAtRow{kRowInRange, kMatrixNew, 704};
inline constexpr CheckSite kDiagonalConstAtColumn{kSquareColumnInRange, kMatrixNew, 705};

// Dense matrices.
inline constexpr CheckSite kAddShapes{"m_ == other.m_ && n_ == other.n_", kMatrixImpl, 236};
inline constexpr CheckSite kAddSizes{"v_.size() == other.v_.size()", kMatrixImpl, 237};
inline constexpr CheckSite kSubtractShapes{"m_ == other.m_ && n_ == other.n_", kMatrixImpl, 256};
inline constexpr CheckSite kSubtractSizes{"v_.size() == other.v_.size()", kMatrixImpl, 257};
inline constexpr CheckSite kSymmetricCastSquare{"rows == cols", kMatrixImpl, 304};
inline constexpr char kDenseColumnIndex[] = "0 <= j && j < n_";
inline constexpr char kDenseRowIndex[] = "0 <= i && i < m_";
inline constexpr CheckSite kGetCol{kDenseColumnIndex, kMatrixImpl, 558};
inline constexpr CheckSite kGetColVector{kDenseColumnIndex, kMatrixImpl, 586};
inline constexpr CheckSite kSetRowMatrix{kDenseRowIndex, kMatrixImpl, 605};
inline constexpr CheckSite kSetRowVector{kDenseRowIndex, kMatrixImpl, 628};
inline constexpr CheckSite kSetColMatrix{kDenseColumnIndex, kMatrixImpl, 644};
inline constexpr CheckSite kSetColVector{kDenseColumnIndex, kMatrixImpl, 667};
inline constexpr CheckSite kRemoveRow{kDenseRowIndex, kMatrixImpl, 693};
inline constexpr CheckSite kRemoveCol{kDenseColumnIndex, kMatrixImpl, 727};
inline constexpr CheckSite kAddRowValue{kStorageMatchesShape, kMatrixImpl, 804};
inline constexpr CheckSite kAddRowVector{
    "mn_ == static_cast<int>( v_.size() ) && \"vector not the right size\"", kMatrixImpl, 829};
inline constexpr CheckSite kAddColValue{kStorageMatchesShape, kMatrixImpl, 853};
inline constexpr CheckSite kSignature{"signature_ == matrixsignature_", kMatrixImpl, 1156};
inline constexpr CheckSite kResizeStorage{kStorageMatchesShape, kMatrixImpl, 1186};

// Triangular and symmetric matrices.
inline constexpr CheckSite kUpperFromVector{"static_cast<int>( v.size() ) == calculate_size( m )",
                                            kUpperImpl, 31};
inline constexpr CheckSite kSymmetricGetRowVector{kSymmetricRowInRange, kSymmetricImpl, 143};
inline constexpr CheckSite kSymmetricGetColVector{kSymmetricColumnInRange, kSymmetricImpl, 161};
inline constexpr CheckSite kInsertColRowIndex{"target_row >= 0 && target_row < m_ + 1",
                                              kSymmetricImpl, 191};
inline constexpr CheckSite kInsertColRowStorage{
    "static_cast<int>( v_.size() ) == calculate_size( m_ )", kSymmetricImpl, 238};
inline constexpr CheckSite kRemoveColRow{kSymmetricColumnInRange, kSymmetricImpl, 279};

// Free functions: a missing output object, a non-square eigen-system input.
inline constexpr CheckSite kCholeskyResult{"result", kMatrixFunctions, 1111};
inline constexpr CheckSite kDiagonalInverseResult{"result", kMatrixFunctions, 1414};
inline constexpr CheckSite kSymmetricInverseResult{"result", kMatrixFunctions, 1594};
inline constexpr CheckSite kEigenSystemsSquare{"iNumRows == lhs.colCount()", kMatrixFunctions,
                                               2025};

}  // namespace vek::matrix_library::sites

#endif  // KELSTAT_MATRIX_MATRIX_CHECK_SITES_H
