// Members of the packed symmetric matrix.
#include <algorithm>
#include <cstddef>
#include <stdexcept>
#include <utility>

#include "matrix/matrix_check_sites.h"
#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_functions.h"
#include "matrix/matrix_new.h"
#include "matrix/matrix_size.h"

namespace vek::matrix_library {

using allege::allegeThat;

template <class T>
Smatrix<T>::Smatrix(int order, T value) {
    resize(order, value);
}

template <class T>
Smatrix<T>::Smatrix(const matrix<T>& source) : Smatrix(source.ConvertToSmatrix()) {}

template <class T>
Smatrix<T>::Smatrix(const matrix<T>& source, bool takeLower) {
    if (source.rowCount() != source.colCount()) {
        throw std::domain_error("Originating matrix must be a square matrix");
    }
    resize(source.rowCount());
    for (int i = 0; i < m_; ++i) {
        for (int k = 0; k <= i; ++k) (*this)(i, k) = takeLower ? source(i, k) : source(k, i);
    }
}

template <class T>
Smatrix<T>& Smatrix<T>::operator=(const matrix<T>& source) {
    Smatrix converted(source);
    swap(converted);
    return *this;
}

template <class T>
int Smatrix<T>::calculate_size(int order) {
    return detail::packedSize(order);
}

template <class T>
T& Smatrix<T>::at(int i, int j) {
    allegeThat(i >= 0 && i < m_, sites::kSymmetricAtRow);
    allegeThat(j >= 0 && j < m_, sites::kSymmetricAtColumn);
    return (*this)(i, j);
}

template <class T>
const T& Smatrix<T>::at(int i, int j) const {
    allegeThat(i >= 0 && i < m_, sites::kSymmetricConstAtRow);
    allegeThat(j >= 0 && j < m_, sites::kSymmetricConstAtColumn);
    return (*this)(i, j);
}

template <class T>
void Smatrix<T>::set(T value) {
    std::fill(v_.begin(), v_.end(), value);
}

template <class T>
void Smatrix<T>::resize(int order, T value) {
    v_.assign(static_cast<std::size_t>(calculate_size(order)), value);
    m_ = order;
}

template <class T>
Smatrix<T> Smatrix<T>::operator-() const {
    Smatrix result(*this);
    for (T& element : result.v_) element = -element;
    return result;
}

template <class T>
std::vector<T> Smatrix<T>::getRowVector(int i) const {
    allegeThat(i >= 0 && i < m_, sites::kSymmetricGetRowVector);
    std::vector<T> row(static_cast<std::size_t>(m_));
    for (int j = 0; j < m_; ++j) row[static_cast<std::size_t>(j)] = (*this)(i, j);
    return row;
}

template <class T>
std::vector<T> Smatrix<T>::getColVector(int j) const {
    allegeThat(j >= 0 && j < m_, sites::kSymmetricGetColVector);
    std::vector<T> column(static_cast<std::size_t>(m_));
    for (int i = 0; i < m_; ++i) column[static_cast<std::size_t>(i)] = (*this)(i, j);
    return column;
}

template <class T>
void Smatrix<T>::insertColRow(int index, T value) {
    allegeThat(index >= 0 && index < m_ + 1, sites::kInsertColRowIndex);
    const int order = detail::checkedCount(std::int64_t{m_} + 1);
    Smatrix grown(order, value);
    for (int i = 0; i < m_; ++i) {
        const int newRow = i + (i >= index ? 1 : 0);
        for (int j = 0; j <= i; ++j) grown(newRow, j + (j >= index ? 1 : 0)) = (*this)(i, j);
    }
    swap(grown);
    allegeThat(static_cast<int>(v_.size()) == calculate_size(m_), sites::kInsertColRowStorage);
}

template <class T>
void Smatrix<T>::insertColRow(int index, const std::vector<T>& values) {
    if (values.size() != static_cast<std::size_t>(m_) + 1) {
        throw MatrixException(
            "insertColRow: vector length must be 1 more than the number of rows in the matrix");
    }
    insertColRow(index, T());
    for (int k = 0; k < m_; ++k) (*this)(index, k) = values[static_cast<std::size_t>(k)];
}

template <class T>
void Smatrix<T>::removeColRow(int j) {
    allegeThat(j >= 0 && j < m_, sites::kRemoveColRow);
    std::vector<T> kept;
    kept.reserve(static_cast<std::size_t>(calculate_size(m_ - 1)));
    for (int row = 0; row < m_; ++row) {
        if (row == j) continue;
        for (int column = 0; column <= row; ++column) {
            if (column != j) kept.push_back((*this)(row, column));
        }
    }
    v_.swap(kept);
    --m_;
}

template <class T>
Smatrix<T> Smatrix<T>::delColRow(int j) const {
    Smatrix result(*this);
    result.removeColRow(j);
    return result;
}

template <class T>
void Smatrix<T>::swap(Smatrix& other) noexcept {
    std::swap(m_, other.m_);
    v_.swap(other.v_);
}

template <class T>
matrix<T> Smatrix<T>::getSubmatrix(int row, int col, int rows, int cols) const {
    const auto fits = [this](int start, int count) {
        return start >= 0 && count >= 0 && std::int64_t{start} + count <= std::int64_t{m_};
    };
    if (!fits(row, rows) || !fits(col, cols)) {
        throw MatrixException("Smatrix::getSubmatrix incompatible matrices");
    }
    matrix<T> block(rows, cols);
    for (int i = 0; i < rows; ++i) {
        for (int j = 0; j < cols; ++j) block(i, j) = (*this)(row + i, col + j);
    }
    return block;
}

template <class T>
void Smatrix<T>::UpdateForFisher(const std::vector<T>& a, const std::vector<T>& b,
                                 const std::vector<T>& c, int count) {
    if (count <= 0) return;
    const auto needed = static_cast<std::size_t>(count);
    if (count > m_ || a.size() < needed || b.size() < needed || c.size() < needed) {
        throw MatrixException("UpdateForFisher: count exceeds the order or a vector's length");
    }
    for (std::size_t i = 0; i < needed; ++i) {
        for (std::size_t j = 0; j <= i; ++j) {
            (*this)(static_cast<int>(i), static_cast<int>(j)) += c[i] * a[j] + b[j];
        }
    }
}

template <class T>
void Smatrix<T>::mFlattenMatrix(std::vector<T>& out, int start, bool byRows) const {
    mFlattenmatrix(*this, out, start, byRows);
}

template <class T>
bool Smatrix<T>::CholeskyDecomp(UTmatrix<T>* factor) const {
    return matrix_library::CholeskyDecomp(*this, factor);
}

template <class T>
UTmatrix<T> Smatrix<T>::mSmatrixToUTmatrix() const {
    return SmatrixToUTmatrix(*this);
}

template <class T>
T Smatrix<T>::mQuadraticForm(const std::vector<T>& x) const {
    return matrix_library::mQuadraticForm(*this, x);
}

template class Smatrix<double>;

}  // namespace vek::matrix_library
