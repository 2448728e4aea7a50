// Members of the diagonal matrix.
#include <algorithm>
#include <cstddef>
#include <utility>

#include "matrix/matrix_check_sites.h"
#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_new.h"
#include "matrix/matrix_size.h"

namespace vek::matrix_library {

using allege::allegeThat;

template <class T>
Dmatrix<T>::Dmatrix(int order, T value) {
    resize(order, value);
}

template <class T>
T& Dmatrix<T>::at(int row, int column) {
    allegeThat(row >= 0 && row < m_, sites::kDiagonalAtRow);
    allegeThat(column >= 0 && column < m_, sites::kDiagonalAtColumn);
    return (*this)(row, column);
}

template <class T>
const T& Dmatrix<T>::at(int row, int column) const {
    allegeThat(row >= 0 && row < m_, sites::kDiagonalConstAtRow);
    allegeThat(column >= 0 && column < m_, sites::kDiagonalConstAtColumn);
    return (*this)(row, column);
}

template <class T>
void Dmatrix<T>::set(T value) {
    std::fill(v_.begin(), v_.end(), value);
}

template <class T>
void Dmatrix<T>::resize(int order, T value) {
    detail::checkDimension(order);
    v_.assign(static_cast<std::size_t>(order), value);
    m_ = order;
}

template <class T>
Dmatrix<T> Dmatrix<T>::operator-() const {
    Dmatrix result(*this);
    for (T& element : result.v_) element = -element;
    return result;
}

template <class T>
matrix<T> Dmatrix<T>::getCol(int j) const {
    matrix<T> column(m_, 1);
    for (int i = 0; i < m_; ++i) column(i, 0) = at(i, j);
    return column;
}

template <class T>
void Dmatrix<T>::removeColRow(int j) {
    if (j < 0 || j >= m_) throw MatrixException("Dmatrix::removeColRow index out of range");
    v_.erase(v_.begin() + j);
    --m_;
}

template <class T>
void Dmatrix<T>::setSubmatrix(int row, int col, const Dmatrix& source) {
    const std::int64_t extent = source.m_;
    if (row < 0 || col < 0 || row + extent > m_ || col + extent > m_) {
        throw MatrixException("Dmatrixmatrix::setSubmatrix incompatible matrices");
    }
    if (row != col) return;
    std::copy(source.v_.begin(), source.v_.end(), v_.begin() + row);
}

template <class T>
void Dmatrix<T>::swap(Dmatrix& other) noexcept {
    std::swap(m_, other.m_);
    v_.swap(other.v_);
}

template class Dmatrix<double>;

}  // namespace vek::matrix_library
