// Element counts of the matrix kinds, refused when a dimension is negative or the count would not
// fit the library's 32-bit sizes. Included only by the library's own sources.
#ifndef KELSTAT_MATRIX_MATRIX_SIZE_H
#define KELSTAT_MATRIX_MATRIX_SIZE_H

#include <cstdint>
#include <limits>

#include "matrix/matrix_exceptions.h"

namespace vek::matrix_library::detail {

inline int checkedCount(std::int64_t count) {
    if (count > std::numeric_limits<int>::max()) throw MatrixException("matrix: too many elements");
    return static_cast<int>(count);
}

inline void checkDimension(int dimension) {
    if (dimension < 0) throw MatrixException("matrix: negative dimension");
}

// rows x cols, the size of a dense matrix.
inline int denseSize(int rows, int cols) {
    checkDimension(rows);
    checkDimension(cols);
    return checkedCount(static_cast<std::int64_t>(rows) * cols);
}

// order (order + 1) / 2, the size of a packed triangle.
inline int packedSize(int order) {
    checkDimension(order);
    return checkedCount(static_cast<std::int64_t>(order) * (order + 1) / 2);
}

}  // namespace vek::matrix_library::detail

#endif  // KELSTAT_MATRIX_MATRIX_SIZE_H
