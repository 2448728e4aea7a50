// Members of the packed upper triangular matrix.
#include <algorithm>
#include <cstddef>
#include <utility>

#include "matrix/matrix_check_sites.h"
#include "matrix/matrix_functions.h"
#include "matrix/matrix_new.h"
#include "matrix/matrix_size.h"

namespace vek::matrix_library {

using allege::allegeThat;

template <class T>
UTmatrix<T>::UTmatrix(int order, T value) {
    resize(order, value);
}

template <class T>
UTmatrix<T>::UTmatrix(int order, const std::vector<T>& packed) {
    allegeThat(packed.size() == static_cast<std::size_t>(calculate_size(order)),
               sites::kUpperFromVector);
    m_ = order;
    v_ = packed;
}

template <class T>
int UTmatrix<T>::calculate_size(int order) {
    return detail::packedSize(order);
}

template <class T>
T& UTmatrix<T>::at(int row, int column) {
    allegeThat(row >= 0 && row < m_, sites::kUpperAtRow);
    allegeThat(column >= 0 && column < m_, sites::kUpperAtColumn);
    return (*this)(row, column);
}

template <class T>
const T& UTmatrix<T>::at(int row, int column) const {
    allegeThat(row >= 0 && row < m_, sites::kUpperConstAtRow);
    allegeThat(column >= 0 && column < m_, sites::kUpperConstAtColumn);
    return (*this)(row, column);
}

template <class T>
void UTmatrix<T>::set(T value) {
    std::fill(v_.begin(), v_.end(), value);
}

template <class T>
void UTmatrix<T>::resize(int order, T value) {
    v_.assign(static_cast<std::size_t>(calculate_size(order)), value);
    m_ = order;
}

template <class T>
UTmatrix<T> UTmatrix<T>::operator-() const {
    UTmatrix result(*this);
    for (T& element : result.v_) element = -element;
    return result;
}

template <class T>
matrix<T> UTmatrix<T>::transpose() const {
    matrix<T> lower(m_, m_);
    for (int i = 0; i < m_; ++i) {
        for (int j = i; j < m_; ++j) lower(j, i) = (*this)(i, j);
    }
    return lower;
}

template <class T>
void UTmatrix<T>::swap(UTmatrix& other) noexcept {
    std::swap(m_, other.m_);
    v_.swap(other.v_);
}

template <class T>
UTmatrix<T> UTmatrix<T>::CholeskyDecomp(int start, int* failIndex, double* pivot) const {
    return matrix_library::CholeskyDecomp(*this, start, failIndex, pivot);
}

template <class T>
std::vector<T> UTmatrix<T>::CholeskyBackSub(const std::vector<T>& b) const {
    return matrix_library::CholeskyBackSub(*this, b);
}

template <class T>
Smatrix<T> UTmatrix<T>::CholeskyInverse() const {
    return matrix_library::CholeskyInverse(*this);
}

template class UTmatrix<double>;

}  // namespace vek::matrix_library
