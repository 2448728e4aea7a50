// Members of the dense matrix.
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <stdexcept>
#include <utility>

#include "matrix/matrix_check_sites.h"
#include "matrix/matrix_eigensystem.h"
#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_functions.h"
#include "matrix/matrix_new.h"
#include "matrix/matrix_size.h"

namespace vek::matrix_library {

using allege::allegeThat;

namespace {

// Mirrored elements may differ by rounding: this much relative to the larger, plus this much.
constexpr double kSymmetryTolerance = 4e-12;

bool mirrorsAgree(double first, double second) {
    const double difference = std::fabs(first - second);
    const double larger = std::max(std::fabs(first), std::fabs(second));
    return difference < kSymmetryTolerance * larger + kSymmetryTolerance;
}

// A block of extent `count` starting at `start` lies inside [0, limit).
bool blockFits(int start, int count, int limit) {
    return start >= 0 && count >= 0 &&
           static_cast<std::int64_t>(start) + count <= static_cast<std::int64_t>(limit);
}

}  // namespace

template <class T>
matrix<T>::matrix(int rows, int cols, T value) {
    ResizeStorage(rows, cols, value);
}

template <class T>
matrix<T>::matrix(const std::vector<T>& elements, int cols) {
    if (elements.empty() && cols >= 0) return;
    if (cols <= 0 || elements.size() % static_cast<std::size_t>(cols) != 0) {
        throw MatrixException("matrix: vector length is not a multiple of the column count");
    }
    const int rows = detail::checkedCount(static_cast<std::int64_t>(elements.size() / cols));
    m_ = rows;
    n_ = cols;
    mn_ = detail::denseSize(rows, cols);
    v_ = elements;
}

template <class T>
matrix<T>::matrix(const Dmatrix<T>& source) {
    *this = source;
}

template <class T>
matrix<T>::matrix(const UTmatrix<T>& source) {
    *this = source;
}

template <class T>
matrix<T>::matrix(const Smatrix<T>& source) {
    *this = source;
}

template <class T>
matrix<T> CreateRowVector(const std::vector<T>& elements) {
    return matrix<T>(elements, detail::checkedCount(static_cast<std::int64_t>(elements.size())));
}

template <class T>
void matrix<T>::Initialize(int rows, int cols, T value) {
    ResizeStorage(rows, cols, value);
}

template <class T>
matrix<T>& matrix<T>::operator=(T value) {
    set(value);
    return *this;
}

template <class T>
void matrix<T>::set(T value) {
    std::fill(v_.begin(), v_.end(), value);
}

template <class T>
matrix<T>& matrix<T>::operator=(const std::vector<T>& column) {
    if (v_ == column) return *this;
    const int rows = detail::checkedCount(static_cast<std::int64_t>(column.size()));
    v_ = column;
    m_ = rows;
    n_ = 1;
    mn_ = rows;
    return *this;
}

template <class T>
matrix<T>& matrix<T>::operator=(const Dmatrix<T>& source) {
    const int order = source.rowCount();
    ResizeStorage(order, order, T());
    for (int i = 0; i < order; ++i) (*this)(i, i) = source(i, i);
    return *this;
}

template <class T>
matrix<T>& matrix<T>::operator=(const Smatrix<T>& source) {
    const int order = source.rowCount();
    ResizeStorage(order, order, T());
    for (int i = 0; i < order; ++i) {
        for (int j = 0; j < order; ++j) (*this)(i, j) = source(i, j);
    }
    return *this;
}

template <class T>
matrix<T>& matrix<T>::operator=(const UTmatrix<T>& source) {
    const int order = source.rowCount();
    ResizeStorage(order, order, T());
    for (int i = 0; i < order; ++i) {
        for (int j = i; j < order; ++j) (*this)(i, j) = source(i, j);
    }
    return *this;
}

template <class T>
void matrix<T>::resize(int rows, int cols, T value) {
    ResizeStorage(rows, cols, value);
}

template <class T>
void matrix<T>::ResizeStorage(int rows, int cols, T value) {
    const int count = detail::denseSize(rows, cols);
    v_.assign(static_cast<std::size_t>(count), value);
    m_ = rows;
    n_ = cols;
    mn_ = count;
    allegeThat(mn_ == static_cast<int>(v_.size()), sites::kResizeStorage);
}

template <class T>
std::vector<T> matrix<T>::ConvertToVector() const {
    if (n_ != 1) throw MatrixException("vector cast: result not a vector");
    return v_;
}

template <class T>
Smatrix<T> matrix<T>::ConvertToSmatrix() const {
    allegeThat(m_ == n_, sites::kSymmetricCastSquare);
    Smatrix<T> result(m_);
    for (int i = 0; i < m_; ++i) {
        for (int j = 0; j <= i; ++j) {
            if (!mirrorsAgree((*this)(i, j), (*this)(j, i))) {
                throw MatrixException("Smatrix cast: result not a symmetric matrix");
            }
            result(i, j) = (*this)(i, j);
        }
    }
    return result;
}

template <class T>
T& matrix<T>::at(int row, int column) {
    allegeThat(row >= 0 && row < m_, sites::kDenseAtRow);
    allegeThat(column >= 0 && column < n_, sites::kDenseAtColumn);
    return (*this)(row, column);
}

template <class T>
const T& matrix<T>::at(int row, int column) const {
    allegeThat(row >= 0 && row < m_, sites::kDenseConstAtRow);
    allegeThat(column >= 0 && column < n_, sites::kDenseConstAtColumn);
    return (*this)(row, column);
}

template <class T>
void matrix<T>::CheckInvariant() const {
    allegeThat(signature_ == matrixsignature_, sites::kSignature);
}

template <class T>
matrix<T> matrix<T>::getRow(int i) const {
    return matrix(getRowVector(i), n_);
}

template <class T>
std::vector<T> matrix<T>::getRowVector(int i) const {
    allegeThat(i >= 0 && i < m_, sites::kDenseConstAtRow);
    const auto first = v_.begin() + static_cast<std::ptrdiff_t>(i) * n_;
    return std::vector<T>(first, first + n_);
}

template <class T>
matrix<T> matrix<T>::getCol(int j) const {
    allegeThat(0 <= j && j < n_, sites::kGetCol);
    matrix result(m_, 1);
    for (int i = 0; i < m_; ++i) result(i, 0) = (*this)(i, j);
    return result;
}

template <class T>
std::vector<T> matrix<T>::getColVector(int j) const {
    allegeThat(0 <= j && j < n_, sites::kGetColVector);
    std::vector<T> result(static_cast<std::size_t>(m_));
    for (int i = 0; i < m_; ++i) result[static_cast<std::size_t>(i)] = (*this)(i, j);
    return result;
}

template <class T>
void matrix<T>::setRow(int i, const matrix& source) {
    allegeThat(0 <= i && i < m_, sites::kSetRowMatrix);
    if (source.mn_ != n_) throw MatrixException("matrix::setRow incompatible matrices");
    if (&source == this) return;  // a row vector set from itself
    std::copy(source.v_.begin(), source.v_.end(), v_.begin() + static_cast<std::ptrdiff_t>(i) * n_);
}

template <class T>
void matrix<T>::setRow(int i, const std::vector<T>& source) {
    allegeThat(0 <= i && i < m_, sites::kSetRowVector);
    if (source.size() != static_cast<std::size_t>(n_)) {
        throw MatrixException("matrix::setRow incompatible matrices");
    }
    std::copy(source.begin(), source.end(), v_.begin() + static_cast<std::ptrdiff_t>(i) * n_);
}

template <class T>
void matrix<T>::setCol(int j, const matrix& source) {
    allegeThat(0 <= j && j < n_, sites::kSetColMatrix);
    if (source.mn_ != m_) throw MatrixException("matrix::setCol incompatible matrices");
    for (int i = 0; i < m_; ++i) (*this)(i, j) = source.v_[static_cast<std::size_t>(i)];
}

template <class T>
void matrix<T>::setCol(int j, const std::vector<T>& source) {
    allegeThat(0 <= j && j < n_, sites::kSetColVector);
    if (source.size() != static_cast<std::size_t>(m_)) {
        throw MatrixException("matrix::setCol incompatible matrices");
    }
    for (int i = 0; i < m_; ++i) (*this)(i, j) = source[static_cast<std::size_t>(i)];
}

template <class T>
void matrix<T>::removeRow(int i) {
    allegeThat(0 <= i && i < m_, sites::kRemoveRow);
    const auto first = v_.begin() + static_cast<std::ptrdiff_t>(i) * n_;
    v_.erase(first, first + n_);
    --m_;
    mn_ = m_ * n_;
}

template <class T>
void matrix<T>::removeCol(int j) {
    allegeThat(0 <= j && j < n_, sites::kRemoveCol);
    std::vector<T> kept;
    kept.reserve(static_cast<std::size_t>(m_) * static_cast<std::size_t>(n_ - 1));
    for (int i = 0; i < m_; ++i) {
        for (int k = 0; k < n_; ++k) {
            if (k != j) kept.push_back((*this)(i, k));
        }
    }
    v_.swap(kept);
    --n_;
    mn_ = m_ * n_;
}

template <class T>
matrix<T> matrix<T>::delRow(int i) const {
    matrix result(*this);
    result.removeRow(i);
    return result;
}

template <class T>
matrix<T> matrix<T>::delCol(int j) const {
    matrix result(*this);
    result.removeCol(j);
    return result;
}

template <class T>
void matrix<T>::addRow(T value) {
    if (mn_ == 0) throw MatrixException("addRow operating on a null matrix");
    insertRow(m_, value);
    allegeThat(mn_ == static_cast<int>(v_.size()), sites::kAddRowValue);
}

template <class T>
void matrix<T>::addCol(T value) {
    if (mn_ == 0) throw MatrixException("addCol operating on a null matrix");
    insertCol(n_, value);
    allegeThat(mn_ == static_cast<int>(v_.size()), sites::kAddColValue);
}

template <class T>
void matrix<T>::addRow(const std::vector<T>& row) {
    if (m_ == 0) n_ = detail::checkedCount(static_cast<std::int64_t>(row.size()));
    insertRow(m_, row);
    allegeThat(mn_ == static_cast<int>(v_.size()), sites::kAddRowVector);
}

template <class T>
void matrix<T>::addCol(const std::vector<T>& column) {
    if (mn_ != 0 && column.size() != static_cast<std::size_t>(m_)) {
        throw MatrixException("addCol column std::vector must be of same order");
    }
    addCol(T());
    for (int i = 0; i < m_; ++i) (*this)(i, n_ - 1) = column[static_cast<std::size_t>(i)];
}

template <class T>
void matrix<T>::insertRow(int i, T value) {
    insertRow(i, std::vector<T>(static_cast<std::size_t>(n_), value));
}

template <class T>
void matrix<T>::insertRow(int i, const std::vector<T>& row) {
    if (row.size() != static_cast<std::size_t>(n_)) {
        throw MatrixException("addRow row std::vector must be of same order");
    }
    if (i < 0 || i > m_) throw MatrixException("insertRow: row index out of range");
    const int count = detail::denseSize(detail::checkedCount(std::int64_t{m_} + 1), n_);
    v_.insert(v_.begin() + static_cast<std::ptrdiff_t>(i) * n_, row.begin(), row.end());
    ++m_;
    mn_ = count;
}

template <class T>
void matrix<T>::insertCol(int j, T value) {
    insertCol(j, std::vector<T>(static_cast<std::size_t>(m_), value));
}

template <class T>
void matrix<T>::insertCol(int j, const std::vector<T>& column) {
    if (column.size() != static_cast<std::size_t>(m_)) {
        throw MatrixException("addCol column std::vector must be of same order");
    }
    if (j < 0 || j > n_) throw MatrixException("insertCol: column index out of range");
    const int wider = detail::checkedCount(std::int64_t{n_} + 1);
    const int count = detail::denseSize(m_, wider);
    std::vector<T> grown;
    grown.reserve(static_cast<std::size_t>(count));
    for (int i = 0; i < m_; ++i) {
        const auto rowStart = v_.begin() + static_cast<std::ptrdiff_t>(i) * n_;
        grown.insert(grown.end(), rowStart, rowStart + j);
        grown.push_back(column[static_cast<std::size_t>(i)]);
        grown.insert(grown.end(), rowStart + j, rowStart + n_);
    }
    v_.swap(grown);
    n_ = wider;
    mn_ = count;
}

template <class T>
void matrix<T>::setSubmatrix(int row, int col, const matrix& source) {
    if (!blockFits(row, source.m_, m_) || !blockFits(col, source.n_, n_)) {
        throw MatrixException("matrix::setSubmatrix incompatible matrices");
    }
    for (int i = 0; i < source.m_; ++i) {
        for (int j = 0; j < source.n_; ++j) (*this)(row + i, col + j) = source(i, j);
    }
}

template <class T>
matrix<T> matrix<T>::getSubmatrix(int row, int col, int rows, int cols) const {
    if (!blockFits(row, rows, m_) || !blockFits(col, cols, n_)) {
        throw MatrixException("matrix::getSubmatrix incompatible matrices");
    }
    matrix result(rows, cols);
    for (int i = 0; i < rows; ++i) {
        for (int j = 0; j < cols; ++j) result(i, j) = (*this)(row + i, col + j);
    }
    return result;
}

template <class T>
void matrix<T>::swap(matrix& other) noexcept {
    std::swap(m_, other.m_);
    std::swap(n_, other.n_);
    std::swap(mn_, other.mn_);
    v_.swap(other.v_);
}

template <class T>
matrix<T> matrix<T>::transpose() const {
    matrix result(n_, m_);
    for (int i = 0; i < m_; ++i) {
        for (int j = 0; j < n_; ++j) result(j, i) = (*this)(i, j);
    }
    return result;
}

template <class T>
matrix<T> matrix<T>::operator-() const {
    matrix result(*this);
    for (T& element : result.v_) element = -element;
    return result;
}

template <class T>
matrix<T>& matrix<T>::operator*=(T factor) {
    for (T& element : v_) element *= factor;
    return *this;
}

template <class T>
matrix<T> matrix<T>::operator*(T factor) const {
    matrix result(*this);
    result *= factor;
    return result;
}

template <class T>
matrix<T>& matrix<T>::operator/=(T divisor) {
    if (divisor == T()) throw std::overflow_error("op/ scalar division by zero");
    for (T& element : v_) element /= divisor;
    return *this;
}

template <class T>
matrix<T> matrix<T>::operator/(T divisor) const {
    matrix result(*this);
    result /= divisor;
    return result;
}

template <class T>
matrix<T>& matrix<T>::operator+=(const matrix& other) {
    allegeThat(m_ == other.m_ && n_ == other.n_, sites::kAddShapes);
    allegeThat(v_.size() == other.v_.size(), sites::kAddSizes);
    for (std::size_t k = 0; k < v_.size(); ++k) v_[k] += other.v_[k];
    return *this;
}

template <class T>
matrix<T>& matrix<T>::operator-=(const matrix& other) {
    allegeThat(m_ == other.m_ && n_ == other.n_, sites::kSubtractShapes);
    allegeThat(v_.size() == other.v_.size(), sites::kSubtractSizes);
    for (std::size_t k = 0; k < v_.size(); ++k) v_[k] -= other.v_[k];
    return *this;
}

template <class T>
void matrix<T>::mFlattenMatrix(std::vector<T>& out, int start, bool byRows) const {
    mFlattenmatrix(*this, out, start, byRows);
}

template <class T>
int matrix<T>::EigenSystems(std::vector<T>& values, matrix& vectors) const {
    return mEigenSystemsIterator(*this, values, vectors);
}

template <class T>
T matrix<T>::mQuadraticForm(const std::vector<T>& x) const {
    return matrix_library::mQuadraticForm(*this, x);
}

template class matrix<double>;
template matrix<double> CreateRowVector(const std::vector<double>& elements);

}  // namespace vek::matrix_library
