// Lazy expression trees: their values against eager arithmetic, that multiplying a tree by a
// dense matrix never evaluates the tree, their text forms and the index checks.
#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <memory>
#include <random>
#include <sstream>
#include <string>

#include "matrix/allege.h"
#include "matrix/matrix_arithmetic.h"
#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_expression.h"
#include "matrix_kinds_support.h"
#include "matrix_test_support.h"

namespace {

using namespace vek::matrix_library::expressions;
using kelstat_test::Dense;
using kelstat_test::Diagonal;
using kelstat_test::messageOf;
using kelstat_test::randomOfKind;
using kelstat_test::Symmetric;
using kelstat_test::Upper;
using vek::allege::AllegeException;
using vek::matrix_library::MatrixException;

// Largest |a(i, j) - b(i, j)|; infinite when the shapes differ.
double maxDifference(const Dense& a, const Dense& b) {
    if (a.rowCount() != b.rowCount() || a.colCount() != b.colCount()) return INFINITY;
    double worst = 0.0;
    for (int i = 0; i < a.rowCount(); ++i) {
        for (int j = 0; j < a.colCount(); ++j)
            worst = std::fmax(worst, std::fabs(a(i, j) - b(i, j)));
    }
    return worst;
}

std::string text(const Expression& e) {
    std::ostringstream out;
    out << e;
    return out.str();
}

// Values of order 1 through products of a few factors of order 6: rounding stays far below this.
constexpr double kTolerance = 1e-13;

TEST(MatrixExpression, TreesAgreeWithEagerArithmetic) {
    std::mt19937_64 engine(41);
    const Dense a = randomOfKind<Dense>(4, 6, engine);
    const Dense b = randomOfKind<Dense>(3, 6, engine);
    const Symmetric s = randomOfKind<Symmetric>(6, 6, engine);
    const Upper u = randomOfKind<Upper>(6, 6, engine);
    const Diagonal g = randomOfKind<Diagonal>(6, 6, engine);
    const Dense c = randomOfKind<Dense>(4, 3, engine);

    // (a (s + u) - a g) b' with row 1 and column 2 cleared, plus c.
    const Expression tree =
        ZeroColumn(ZeroRow(Mult(Sub(M_(a) * (M_(s) + M_(u)), M_(a) * M_(g)), Transpose(M_(b))), 1),
                   2) +
        M_(c);
    Dense eager = (a * (s + u) - a * g) * b.transpose();
    for (int j = 0; j < 3; ++j) eager(1, j) = 0.0;
    for (int i = 0; i < 4; ++i) eager(i, 2) = 0.0;
    eager = eager + c;

    EXPECT_EQ(RowCount(tree), 4);
    EXPECT_EQ(ColumnCount(tree), 3);
    EXPECT_LE(maxDifference(Evaluate(tree), eager), kTolerance);

    const Dense right = randomOfKind<Dense>(3, 5, engine);
    const Dense left = randomOfKind<Dense>(2, 4, engine);
    EXPECT_LE(maxDifference(MultiplyOnRight(tree, right), eager * right), kTolerance);
    EXPECT_LE(maxDifference(MultiplyOnLeft(left, tree), left * eager), kTolerance);
    for (int i = 0; i < 4; ++i)
        EXPECT_LE(maxDifference(GetRow(tree, i), eager.getRow(i)), kTolerance);
    for (int j = 0; j < 3; ++j) {
        EXPECT_LE(maxDifference(GetColumn(tree, j), eager.getCol(j)), kTolerance);
    }
    // Transposing twice, and each leaf kind on its own, give the value back exactly.
    EXPECT_EQ(maxDifference(Evaluate(Transpose(Transpose(M_(a)))), a), 0.0);
    EXPECT_EQ(maxDifference(Evaluate(M_(s)), Dense(s)), 0.0);
    EXPECT_EQ(maxDifference(Evaluate(M_(u)), Dense(u)), 0.0);
    EXPECT_EQ(maxDifference(Evaluate(M_(g)), Dense(g)), 0.0);
}

// How often the leaves were asked for what.
struct Calls {
    int evaluations = 0;
    int onRight = 0;
    int onLeft = 0;
};

// A leaf that counts its calls; a full evaluation of a tree is the only way to need one.
class CountingLeaf final : public ExpressionNode {
  public:
    CountingLeaf(const Dense& value, Calls* calls)
        : ExpressionNode(value.rowCount(), value.colCount()), value_(value), calls_(calls) {}
    Dense MultiplyOnRight(const Dense& m) const override {
        ++calls_->onRight;
        return value_ * m;
    }
    Dense MultiplyOnLeft(const Dense& m) const override {
        ++calls_->onLeft;
        return m * value_;
    }
    Dense Evaluate() const override {
        ++calls_->evaluations;
        return value_;
    }
    void ToString(std::ostream& out, int level) const override { out << "<leaf " << level << ">"; }

  private:
    Dense value_;
    Calls* calls_;
};

TEST(MatrixExpression, MultiplyingATreeEvaluatesNoPartOfIt) {
    std::mt19937_64 engine(43);
    Calls calls;
    const Expression p = std::make_shared<CountingLeaf>(randomOfKind<Dense>(5, 4, engine), &calls);
    const Expression q = std::make_shared<CountingLeaf>(randomOfKind<Dense>(5, 4, engine), &calls);
    // p q' is 5 x 5; the tree's matrix is never needed to get one row or column of it.
    const Expression tree = ZeroColumn(
        ZeroRow(Sub(Mult(p, Transpose(q)) + Mult(q, Transpose(p)), Mult(p, Transpose(p))), 0), 4);
    EXPECT_EQ(calls.evaluations + calls.onLeft + calls.onRight, 0) << "building computed something";

    const Dense row = GetRow(tree, 2);
    const Dense column = GetColumn(tree, 3);
    const Dense product = MultiplyOnRight(tree, randomOfKind<Dense>(5, 2, engine));
    EXPECT_EQ(calls.evaluations, 0);
    EXPECT_GT(calls.onLeft + calls.onRight, 0);
    EXPECT_EQ(row.rowCount(), 1);
    EXPECT_EQ(column.colCount(), 1);
    EXPECT_EQ(product.colCount(), 2);

    // The full value evaluates each leaf occurrence exactly once.
    Evaluate(tree);
    EXPECT_EQ(calls.evaluations, 6);
}

TEST(MatrixExpression, TextForms) {
    const Expression a = M_(Dense(2, 3));
    const Expression b = M_(Dense(2, 3));
    EXPECT_EQ(text(Mult(a, Transpose(b))), "( < Matrix 2 by 3> * ( < Matrix 2 by 3> transpose ) )");
    EXPECT_EQ(text(Add(M_(Symmetric(3)), M_(Upper(3)))), "( < Matrix 3 by 3> + < Matrix 3 by 3>)");
    EXPECT_EQ(text(M_(Diagonal(4)) - M_(Dense(4, 1))), "( < Matrix 4 by 4> - < Matrix 4 by 1>)");
    EXPECT_EQ(text(ZeroRow(a, 1)), "(zero row : 1 < Matrix 2 by 3>)");
    EXPECT_EQ(text(ZeroColumn(a, 2)), "(zero column : 2 < Matrix 2 by 3>)");

    // Children print one level deeper than their parent.
    Calls calls;
    const Expression leaf = std::make_shared<CountingLeaf>(Dense(1, 1), &calls);
    EXPECT_EQ(text(leaf * Transpose(leaf)), "( <leaf 1> * ( <leaf 2> transpose ) )");

    std::ostringstream out;
    vek::matrix_library::expressions::showMatrix(out, 2.5);
    EXPECT_EQ(out.str(), "<Value: 2.5>");
}

TEST(MatrixExpression, IndexChecksAndLateShapeErrors) {
    const Expression three = M_(Dense(3, 3, 1.0));
    const std::string file = " src/matrix/matrix_expression: ";
    struct Case {
        const char* what;
        std::function<void()> action;
        std::string message;
    };
    const Case cases[] = {
        {"row past the end", [&] { GetRow(three, 3); },
         "assertion failed: (row >= 0 && row < M)" + file + "632"},
        {"negative row", [&] { GetRow(three, -1); },
         "assertion failed: (row >= 0 && row < M)" + file + "632"},
        {"column past the end", [&] { GetColumn(three, 3); },
         "assertion failed: (column >= 0 && column < N)" + file + "643"},
        {"zeroed row outside", [&] { Evaluate(ZeroRow(three, 3)); },
         "assertion failed: (row >= 0 && row < m.rowCount())" + file + "27"},
        {"zeroed column outside", [&] { Evaluate(ZeroColumn(three, -1)); },
         "assertion failed: (column >= 0 && column < m.colCount())" + file + "40"},
    };
    for (const Case& c : cases)
        EXPECT_EQ(messageOf<AllegeException>(c.action), c.message) << c.what;

    // Built without a check; the eager product reports the mismatch when it is reached.
    const Expression mismatched = Mult(M_(Dense(2, 3)), M_(Dense(2, 3)));
    EXPECT_EQ(RowCount(mismatched), 2);
    EXPECT_EQ(ColumnCount(mismatched), 3);
    EXPECT_EQ(messageOf<MatrixException>([&] { Evaluate(mismatched); }),
              "Matrix multiplication: incompatible orders");
    EXPECT_EQ(messageOf<MatrixException>([&] { GetRow(mismatched, 0); }),
              "Matrix multiplication: incompatible orders");
}

}  // namespace
