#include "matrix/matrix_expression.h"

#include <ostream>
#include <utility>

#include "matrix/allege.h"
#include "matrix/matrix_arithmetic.h"

namespace vek::matrix_library::expressions {

namespace {

using allege::allegeThat;
using allege::CheckSite;

constexpr char kExpressionFile[] = "src/matrix/matrix_expression";
constexpr CheckSite kClearRow{"row >= 0 && row < m.rowCount()", kExpressionFile, 27};
constexpr CheckSite kClearColumn{"column >= 0 && column < m.colCount()", kExpressionFile, 40};
constexpr CheckSite kGetRow{"row >= 0 && row < M", kExpressionFile, 632};
constexpr CheckSite kGetColumn{"column >= 0 && column < N", kExpressionFile, 643};

void clearRow(matrix<double>& m, int row) {
    allegeThat(row >= 0 && row < m.rowCount(), kClearRow);
    for (int j = 0; j < m.colCount(); ++j) m(row, j) = 0.0;
}

void clearColumn(matrix<double>& m, int column) {
    allegeThat(column >= 0 && column < m.colCount(), kClearColumn);
    for (int i = 0; i < m.rowCount(); ++i) m(i, column) = 0.0;
}

// A leaf: a copy of a matrix of any of the four kinds.
template <class Kind>
class ValueNode final : public ExpressionNode {
  public:
    explicit ValueNode(const Kind& value)
        : ExpressionNode(value.rowCount(), value.colCount()), value_(value) {}

    matrix<double> MultiplyOnRight(const matrix<double>& m) const override { return value_ * m; }
    matrix<double> MultiplyOnLeft(const matrix<double>& m) const override { return m * value_; }
    matrix<double> Evaluate() const override { return matrix<double>(value_); }
    void ToString(std::ostream& out, int /*level*/) const override {
        out << "< Matrix " << rowCount() << " by " << colCount() << ">";
    }

  private:
    Kind value_;
};

// Common part of the nodes with two children.
class BinaryNode : public ExpressionNode {
  protected:
    BinaryNode(Expression left, Expression right)
        : ExpressionNode(left->rowCount(), right->colCount()),
          left_(std::move(left)),
          right_(std::move(right)) {}

    // "( " left <symbol> right ")".
    void write(std::ostream& out, int level, const char* symbol) const {
        out << "( ";
        left_->ToString(out, level + 1);
        out << symbol;
        right_->ToString(out, level + 1);
        out << ")";
    }

    Expression left_;
    Expression right_;
};

// L R: a dense factor passes through R before L (or L before R from the left), so neither L R
// nor any other intermediate of the tree's own size is formed.
class MultNode final : public BinaryNode {
  public:
    MultNode(Expression left, Expression right) : BinaryNode(std::move(left), std::move(right)) {}

    matrix<double> MultiplyOnRight(const matrix<double>& m) const override {
        return left_->MultiplyOnRight(right_->MultiplyOnRight(m));
    }
    matrix<double> MultiplyOnLeft(const matrix<double>& m) const override {
        return right_->MultiplyOnLeft(left_->MultiplyOnLeft(m));
    }
    matrix<double> Evaluate() const override { return left_->Evaluate() * right_->Evaluate(); }
    void ToString(std::ostream& out, int level) const override { write(out, level, " * "); }
};

class AddNode final : public BinaryNode {
  public:
    AddNode(Expression left, Expression right) : BinaryNode(std::move(left), std::move(right)) {}

    matrix<double> MultiplyOnRight(const matrix<double>& m) const override {
        return left_->MultiplyOnRight(m) + right_->MultiplyOnRight(m);
    }
    matrix<double> MultiplyOnLeft(const matrix<double>& m) const override {
        return left_->MultiplyOnLeft(m) + right_->MultiplyOnLeft(m);
    }
    matrix<double> Evaluate() const override { return left_->Evaluate() + right_->Evaluate(); }
    void ToString(std::ostream& out, int level) const override { write(out, level, " + "); }
};

class SubNode final : public BinaryNode {
  public:
    SubNode(Expression left, Expression right) : BinaryNode(std::move(left), std::move(right)) {}

    matrix<double> MultiplyOnRight(const matrix<double>& m) const override {
        return left_->MultiplyOnRight(m) - right_->MultiplyOnRight(m);
    }
    matrix<double> MultiplyOnLeft(const matrix<double>& m) const override {
        return left_->MultiplyOnLeft(m) - right_->MultiplyOnLeft(m);
    }
    matrix<double> Evaluate() const override { return left_->Evaluate() - right_->Evaluate(); }
    void ToString(std::ostream& out, int level) const override { write(out, level, " - "); }
};

// C': (C' M) = (M' C)', so only the dense factor is ever transposed.
class TransposeNode final : public ExpressionNode {
  public:
    explicit TransposeNode(Expression child)
        : ExpressionNode(child->colCount(), child->rowCount()), child_(std::move(child)) {}

    matrix<double> MultiplyOnRight(const matrix<double>& m) const override {
        return child_->MultiplyOnLeft(m.transpose()).transpose();
    }
    matrix<double> MultiplyOnLeft(const matrix<double>& m) const override {
        return child_->MultiplyOnRight(m.transpose()).transpose();
    }
    matrix<double> Evaluate() const override { return child_->Evaluate().transpose(); }
    void ToString(std::ostream& out, int level) const override {
        out << "( ";
        child_->ToString(out, level + 1);
        out << " transpose ) ";
    }

  private:
    Expression child_;
};

// C with row `row` zeroed, i.e. Z C where Z is the identity with a zero at (row, row).
class ZeroRowNode final : public ExpressionNode {
  public:
    ZeroRowNode(Expression child, int row)
        : ExpressionNode(child->rowCount(), child->colCount()),
          child_(std::move(child)),
          row_(row) {}

    matrix<double> MultiplyOnRight(const matrix<double>& m) const override {
        matrix<double> product = child_->MultiplyOnRight(m);
        clearRow(product, row_);
        return product;
    }
    matrix<double> MultiplyOnLeft(const matrix<double>& m) const override {
        matrix<double> masked(m);
        clearColumn(masked, row_);
        return child_->MultiplyOnLeft(masked);
    }
    matrix<double> Evaluate() const override {
        matrix<double> value = child_->Evaluate();
        clearRow(value, row_);
        return value;
    }
    void ToString(std::ostream& out, int level) const override {
        out << "(zero row : " << row_ << " ";
        child_->ToString(out, level + 1);
        out << ")";
    }

  private:
    Expression child_;
    int row_;
};

// C with column `column` zeroed, i.e. C Z.
class ZeroColumnNode final : public ExpressionNode {
  public:
    ZeroColumnNode(Expression child, int column)
        : ExpressionNode(child->rowCount(), child->colCount()),
          child_(std::move(child)),
          column_(column) {}

    matrix<double> MultiplyOnRight(const matrix<double>& m) const override {
        matrix<double> masked(m);
        clearRow(masked, column_);
        return child_->MultiplyOnRight(masked);
    }
    matrix<double> MultiplyOnLeft(const matrix<double>& m) const override {
        matrix<double> product = child_->MultiplyOnLeft(m);
        clearColumn(product, column_);
        return product;
    }
    matrix<double> Evaluate() const override {
        matrix<double> value = child_->Evaluate();
        clearColumn(value, column_);
        return value;
    }
    void ToString(std::ostream& out, int level) const override {
        out << "(zero column : " << column_ << " ";
        child_->ToString(out, level + 1);
        out << ")";
    }

  private:
    Expression child_;
    int column_;
};

}  // namespace

Expression M_(const matrix<double>& value) {
    return std::make_shared<const ValueNode<matrix<double>>>(value);
}
Expression M_(const Smatrix<double>& value) {
    return std::make_shared<const ValueNode<Smatrix<double>>>(value);
}
Expression M_(const Dmatrix<double>& value) {
    return std::make_shared<const ValueNode<Dmatrix<double>>>(value);
}
Expression M_(const UTmatrix<double>& value) {
    return std::make_shared<const ValueNode<UTmatrix<double>>>(value);
}

Expression Mult(const Expression& left, const Expression& right) {
    return std::make_shared<const MultNode>(left, right);
}
Expression Add(const Expression& left, const Expression& right) {
    return std::make_shared<const AddNode>(left, right);
}
Expression Sub(const Expression& left, const Expression& right) {
    return std::make_shared<const SubNode>(left, right);
}
Expression Transpose(const Expression& child) {
    return std::make_shared<const TransposeNode>(child);
}
Expression ZeroRow(const Expression& child, int row) {
    return std::make_shared<const ZeroRowNode>(child, row);
}
Expression ZeroColumn(const Expression& child, int column) {
    return std::make_shared<const ZeroColumnNode>(child, column);
}

Expression operator*(const Expression& left, const Expression& right) {
    return Mult(left, right);
}
Expression operator+(const Expression& left, const Expression& right) {
    return Add(left, right);
}
Expression operator-(const Expression& left, const Expression& right) {
    return Sub(left, right);
}

matrix<double> Evaluate(const Expression& a) {
    return a->Evaluate();
}
matrix<double> MultiplyOnRight(const Expression& a, const matrix<double>& m) {
    return a->MultiplyOnRight(m);
}
matrix<double> MultiplyOnLeft(const matrix<double>& m, const Expression& a) {
    return a->MultiplyOnLeft(m);
}

matrix<double> GetRow(const Expression& a, int row) {
    const int M = a->rowCount();
    allegeThat(row >= 0 && row < M, kGetRow);
    matrix<double> unit(1, M, 0.0);
    unit(0, row) = 1.0;
    return a->MultiplyOnLeft(unit);
}

matrix<double> GetColumn(const Expression& a, int column) {
    const int N = a->colCount();
    allegeThat(column >= 0 && column < N, kGetColumn);
    matrix<double> unit(N, 1, 0.0);
    unit(column, 0) = 1.0;
    return a->MultiplyOnRight(unit);
}

int RowCount(const Expression& a) {
    return a->rowCount();
}
int ColumnCount(const Expression& a) {
    return a->colCount();
}

std::ostream& operator<<(std::ostream& out, const Expression& a) {
    a->ToString(out, 0);
    return out;
}

void showMatrix(std::ostream& out, double value) {
    out << "<Value: " << value << ">";
}

}  // namespace vek::matrix_library::expressions
