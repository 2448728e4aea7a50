// The four kinds of matrices of doubles: dense, packed symmetric, packed upper triangular and
// diagonal. Indexes and sizes are 32-bit ints counted from 0. Checked operations throw
// vek::allege::AllegeException or MatrixException (matrix/matrix_exceptions.h); the unchecked
// operator() trusts its indexes.
#ifndef KELSTAT_MATRIX_MATRIX_NEW_H
#define KELSTAT_MATRIX_MATRIX_NEW_H

#include <cstddef>
#include <cstdint>
#include <vector>

namespace vek::matrix_library {

template <class T>
class matrix;
template <class T>
class Smatrix;
template <class T>
class UTmatrix;
template <class T>
class Dmatrix;

// Dense matrix; element (i, j) is v_[i * n_ + j]. A matrix is empty when it has no rows or no
// columns.
template <class T>
class matrix {
  public:
    // The bit pattern 0xfeedbaaa, stamped by every constructor.
    static constexpr std::int32_t matrixsignature_ = static_cast<std::int32_t>(0xfeedbaaaU);

    matrix() = default;
    matrix(int rows, int cols, T value = T());
    // Rows of cols elements taken in order from the vector. An empty vector gives 0 x 0; a
    // negative or zero cols with elements, or a length that is not a multiple of cols, throws.
    matrix(const std::vector<T>& elements, int cols);
    explicit matrix(const Dmatrix<T>& source);
    explicit matrix(const UTmatrix<T>& source);
    // Both triangles, mirrored from the packed storage.
    explicit matrix(const Smatrix<T>& source);

    void Initialize(int rows, int cols, T value);
    matrix& operator=(T value);
    void set(T value);
    // Becomes a column vector holding the elements; left alone when it already holds exactly
    // these elements.
    matrix& operator=(const std::vector<T>& column);
    matrix& operator=(const Dmatrix<T>& source);
    matrix& operator=(const Smatrix<T>& source);
    matrix& operator=(const UTmatrix<T>& source);
    // Contents are not kept: every element becomes value.
    void resize(int rows, int cols, T value = T());

    // The elements of a matrix of one column ("vector cast: result not a vector" otherwise).
    std::vector<T> ConvertToVector() const;
    explicit operator std::vector<T>() const { return ConvertToVector(); }
    // The packed symmetric matrix; mirrored elements must agree within 4e-12 relative plus 4e-12.
    Smatrix<T> ConvertToSmatrix() const;

    T& operator()(int row, int column) { return v_[static_cast<std::size_t>(row) * n_ + column]; }
    const T& operator()(int row, int column) const {
        return v_[static_cast<std::size_t>(row) * n_ + column];
    }
    T& at(int row, int column);
    const T& at(int row, int column) const;
    void range_check(int, int) const {}

    int rowCount() const { return m_; }
    int colCount() const { return n_; }
    int size() const { return mn_; }
    bool empty() const { return m_ == 0 || n_ == 0; }
    void CheckInvariant() const;

    // Index checks of the row readers are those of the const at().
    matrix getRow(int i) const;
    std::vector<T> getRowVector(int i) const;
    matrix getCol(int j) const;
    std::vector<T> getColVector(int j) const;
    // The source supplies its elements in order and must hold exactly one row's (column's) worth.
    void setRow(int i, const matrix& source);
    void setRow(int i, const std::vector<T>& source);
    void setCol(int j, const matrix& source);
    void setCol(int j, const std::vector<T>& source);
    void removeRow(int i);
    void removeCol(int j);
    matrix delRow(int i) const;
    matrix delCol(int j) const;
    void addRow(T value);
    void addCol(T value);
    void addRow(const std::vector<T>& row);
    void addCol(const std::vector<T>& column);
    // Insert before row i (column j); i = rowCount() appends. Other indexes throw MatrixException.
    void insertRow(int i, T value);
    void insertRow(int i, const std::vector<T>& row);
    void insertCol(int j, T value);
    void insertCol(int j, const std::vector<T>& column);
    void setSubmatrix(int row, int col, const matrix& source);
    matrix getSubmatrix(int row, int col, int rows, int cols) const;

    void swap(matrix& other) noexcept;
    matrix transpose() const;
    matrix operator-() const;
    matrix& operator*=(T factor);
    matrix operator*(T factor) const;
    // Division by zero (either sign) throws std::overflow_error.
    matrix& operator/=(T divisor);
    matrix operator/(T divisor) const;
    matrix& operator+=(const matrix& other);
    matrix& operator-=(const matrix& other);

    void mFlattenMatrix(std::vector<T>& out, int start, bool byRows) const;
    // Eigenvalues ascending and unit eigenvectors in columns; see mEigenSystemsIterator.
    int EigenSystems(std::vector<T>& values, matrix& vectors) const;
    // x' A x; see the free mQuadraticForm.
    T mQuadraticForm(const std::vector<T>& x) const;

  private:
    void ResizeStorage(int rows, int cols, T value);

    std::int32_t signature_ = matrixsignature_;
    std::int32_t m_ = 0;
    std::int32_t n_ = 0;
    std::int32_t mn_ = 0;
    std::vector<T> v_;
};

// A 1 x n matrix holding the vector (0 x 0 for an empty one).
template <class T>
matrix<T> CreateRowVector(const std::vector<T>& elements);

// Symmetric matrix of order m_, the lower triangle packed by rows: element (i, j) is
// v_[k (k + 1) / 2 + l] with k = max(i, j) and l = min(i, j).
template <class T>
class Smatrix {
  public:
    Smatrix() = default;
    explicit Smatrix(int order, T value = T());
    // Square and symmetric within the tolerance of matrix::ConvertToSmatrix.
    explicit Smatrix(const matrix<T>& source);
    // No symmetry test: the lower triangle of a square source (takeLower) or its upper triangle.
    // A source that is not square throws std::domain_error.
    Smatrix(const matrix<T>& source, bool takeLower);
    Smatrix& operator=(const matrix<T>& source);

    static int calculate_size(int order);

    T& operator()(int i, int j) { return v_[packedIndex(i, j)]; }
    const T& operator()(int i, int j) const { return v_[packedIndex(i, j)]; }
    T& at(int i, int j);
    const T& at(int i, int j) const;
    void range_check(int, int) const {}

    int rowCount() const { return m_; }
    int colCount() const { return m_; }
    int size() const { return static_cast<int>(v_.size()); }
    bool isEmpty() const { return m_ == 0; }

    void set(T value);
    void resize(int order, T value = T());
    Smatrix operator-() const;
    std::vector<T> getRowVector(int i) const;
    std::vector<T> getColVector(int j) const;
    // Grows the order by one with a new row and column at index (0 to the order).
    void insertColRow(int index, T value);
    // As above with 0.0, then row and column index take the vector, which needs order + 1 values.
    void insertColRow(int index, const std::vector<T>& values);
    void removeColRow(int j);
    Smatrix delColRow(int j) const;
    Smatrix transpose() const { return *this; }
    void swap(Smatrix& other) noexcept;
    // Dense rows x cols block at (row, col); it must lie inside the matrix.
    matrix<T> getSubmatrix(int row, int col, int rows, int cols) const;
    // Adds c[i] * a[j] + b[j] to element (i, j) for j <= i < count; each vector needs count values.
    void UpdateForFisher(const std::vector<T>& a, const std::vector<T>& b, const std::vector<T>& c,
                         int count);
    void mFlattenMatrix(std::vector<T>& out, int start, bool byRows) const;

    bool CholeskyDecomp(UTmatrix<T>* factor) const;
    UTmatrix<T> mSmatrixToUTmatrix() const;
    T mQuadraticForm(const std::vector<T>& x) const;

  private:
    static std::size_t packedIndex(int i, int j) {
        const std::size_t high = static_cast<std::size_t>(i > j ? i : j);
        const std::size_t low = static_cast<std::size_t>(i > j ? j : i);
        return high * (high + 1) / 2 + low;
    }

    std::int32_t m_ = 0;
    std::vector<T> v_;
};

// Upper triangular matrix of order m_, packed by rows: element (i, j), i <= j, is
// v_[i * m_ - i (i + 1) / 2 + j]. Elements below the diagonal read as zero; writes to them go to
// a scratch slot and are lost.
template <class T>
class UTmatrix {
  public:
    UTmatrix() = default;
    explicit UTmatrix(int order, T value = T());
    // The packed elements in storage order; the vector must hold calculate_size(order) of them.
    UTmatrix(int order, const std::vector<T>& packed);

    static int calculate_size(int order);

    T& operator()(int row, int column) {
        if (row > column) {
            scratch_ = T();
            return scratch_;
        }
        return v_[packedIndex(row, column)];
    }
    const T& operator()(int row, int column) const {
        return row > column ? zero_ : v_[packedIndex(row, column)];
    }
    T& at(int row, int column);
    const T& at(int row, int column) const;
    void range_check(int, int) const {}

    int rowCount() const { return m_; }
    int colCount() const { return m_; }
    int size() const { return static_cast<int>(v_.size()); }
    bool isEmpty() const { return m_ == 0; }

    void set(T value);
    void resize(int order, T value = T());
    UTmatrix operator-() const;
    // The lower triangular transpose, as a dense matrix.
    matrix<T> transpose() const;
    void swap(UTmatrix& other) noexcept;

    UTmatrix CholeskyDecomp(int start, int* failIndex, double* pivot) const;
    std::vector<T> CholeskyBackSub(const std::vector<T>& b) const;
    Smatrix<T> CholeskyInverse() const;

  private:
    std::size_t packedIndex(int row, int column) const {
        const std::size_t i = static_cast<std::size_t>(row);
        return i * static_cast<std::size_t>(m_) - i * (i + 1) / 2 +
               static_cast<std::size_t>(column);
    }

    std::int32_t m_ = 0;
    std::vector<T> v_;
    T zero_ = T();
    T scratch_ = T();
};

// Diagonal matrix of order m_; v_ holds the diagonal. Off-diagonal elements behave as the zero
// part of UTmatrix.
template <class T>
class Dmatrix {
  public:
    Dmatrix() = default;
    explicit Dmatrix(int order, T value = T());

    T& operator()(int row, int column) {
        if (row != column) {
            scratch_ = T();
            return scratch_;
        }
        return v_[static_cast<std::size_t>(row)];
    }
    const T& operator()(int row, int column) const {
        return row != column ? zero_ : v_[static_cast<std::size_t>(row)];
    }
    T& at(int row, int column);
    const T& at(int row, int column) const;
    void range_check(int, int) const {}

    int rowCount() const { return m_; }
    int colCount() const { return m_; }
    int size() const { return m_; }
    bool isEmpty() const { return m_ == 0; }

    void set(T value);
    void resize(int order, T value = T());
    Dmatrix operator-() const;
    // Column j as a dense m x 1 matrix; the index is checked as by the const at().
    matrix<T> getCol(int j) const;
    void removeColRow(int j);
    // Copies a diagonal source onto the diagonal at (row, row); an off-diagonal block (row != col)
    // is all zero and leaves the matrix alone. The block must lie inside the matrix.
    void setSubmatrix(int row, int col, const Dmatrix& source);
    Dmatrix transpose() const { return *this; }
    void swap(Dmatrix& other) noexcept;

  private:
    T zero_ = T();
    std::int32_t m_ = 0;
    std::vector<T> v_;
    T scratch_ = T();
};

extern template class matrix<double>;
extern template class Smatrix<double>;
extern template class UTmatrix<double>;
extern template class Dmatrix<double>;
extern template matrix<double> CreateRowVector(const std::vector<double>& elements);

}  // namespace vek::matrix_library

#endif  // KELSTAT_MATRIX_MATRIX_NEW_H
