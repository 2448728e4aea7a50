// Exceptions of the matrix library: misuse of dimensions and singular matrices.
#ifndef KELSTAT_MATRIX_MATRIX_EXCEPTIONS_H
#define KELSTAT_MATRIX_MATRIX_EXCEPTIONS_H

#include <stdexcept>
#include <string>

namespace vek::matrix_library {

// Incompatible dimensions, failed casts between kinds, indexes out of range.
class MatrixException : public std::runtime_error {
  public:
    explicit MatrixException(const std::string& message) : std::runtime_error(message) {}
};

// A factorisation or an inversion met a matrix it cannot invert.
class MatrixSingular : public std::runtime_error {
  public:
    MatrixSingular() : std::runtime_error("Matrix is singular") {}
};

}  // namespace vek::matrix_library

#endif  // KELSTAT_MATRIX_MATRIX_EXCEPTIONS_H
