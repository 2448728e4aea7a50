// Lazy matrix expressions: a tree of immutable, shared nodes that describes a product, sum,
// difference or transpose without computing it. A tree can be multiplied by a dense matrix from
// either side, which pushes the dense factor through the tree and so never forms the tree's own
// matrix, evaluated in full, asked for one row or one column, or printed.
//
// Nodes are built without shape checks; a mismatch surfaces as the MatrixException of the eager
// operator (matrix/matrix_arithmetic.h) that meets it when the tree is multiplied or evaluated.
// Trees may be shared and evaluated from several threads at once.
#ifndef KELSTAT_MATRIX_MATRIX_EXPRESSION_H
#define KELSTAT_MATRIX_MATRIX_EXPRESSION_H

#include <cstdint>
#include <iosfwd>
#include <memory>

#include "matrix/matrix_new.h"

namespace vek::matrix_library::expressions {

// One node of an expression tree, standing for a rows x cols matrix A.
class ExpressionNode {
  public:
    ExpressionNode(int rows, int cols) : rows_(rows), cols_(cols) {}
    ExpressionNode(const ExpressionNode&) = delete;
    ExpressionNode& operator=(const ExpressionNode&) = delete;
    virtual ~ExpressionNode() = default;

    // A M.
    virtual matrix<double> MultiplyOnRight(const matrix<double>& m) const = 0;
    // M A.
    virtual matrix<double> MultiplyOnLeft(const matrix<double>& m) const = 0;
    // A itself.
    virtual matrix<double> Evaluate() const = 0;
    // The text form; level is the nesting depth, one more for each child.
    virtual void ToString(std::ostream& out, int level) const = 0;

    int rowCount() const { return rows_; }
    int colCount() const { return cols_; }

  private:
    std::int32_t rows_;
    std::int32_t cols_;
};

// Handle of a (sub-)tree; copies share the nodes.
using Expression = std::shared_ptr<const ExpressionNode>;

// Leaves holding a copy of the matrix.
Expression M_(const matrix<double>& value);
Expression M_(const Smatrix<double>& value);
Expression M_(const Dmatrix<double>& value);
Expression M_(const UTmatrix<double>& value);

Expression Mult(const Expression& left, const Expression& right);
Expression Add(const Expression& left, const Expression& right);
Expression Sub(const Expression& left, const Expression& right);
Expression Transpose(const Expression& child);
// The matrix of child with row `row` (column `column`) set to zero.
Expression ZeroRow(const Expression& child, int row);
Expression ZeroColumn(const Expression& child, int column);

Expression operator*(const Expression& left, const Expression& right);
Expression operator+(const Expression& left, const Expression& right);
Expression operator-(const Expression& left, const Expression& right);

matrix<double> Evaluate(const Expression& a);
matrix<double> MultiplyOnRight(const Expression& a, const matrix<double>& m);
matrix<double> MultiplyOnLeft(const matrix<double>& m, const Expression& a);
// Row `row` (1 x columns) as e' A, or column `column` (rows x 1) as A e, with a unit vector e.
// The index must lie inside the expression's shape (an AllegeException otherwise).
matrix<double> GetRow(const Expression& a, int row);
matrix<double> GetColumn(const Expression& a, int column);
int RowCount(const Expression& a);
int ColumnCount(const Expression& a);

// a's text form at level 0, e.g. "( < Matrix 2 by 3> * ( < Matrix 2 by 3> transpose ) )".
std::ostream& operator<<(std::ostream& out, const Expression& a);
// Writes "<Value: " value ">".
void showMatrix(std::ostream& out, double value);

}  // namespace vek::matrix_library::expressions

#endif  // KELSTAT_MATRIX_MATRIX_EXPRESSION_H
