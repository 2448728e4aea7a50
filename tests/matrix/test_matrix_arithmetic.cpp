// Sums, differences and products over the four matrix kinds: result kinds, values against plain
// loops, and the shape checks with their messages.
#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>
#include <random>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "matrix/allege.h"
#include "matrix/matrix_arithmetic.h"
#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_ludecomposition.h"
#include "matrix_kinds_support.h"
#include "matrix_test_support.h"

namespace {

using namespace vek::matrix_library;  // the operators under test
using kelstat_test::Dense;
using kelstat_test::Diagonal;
using kelstat_test::messageOf;
using kelstat_test::randomOfKind;
using kelstat_test::referenceProduct;
using kelstat_test::Symmetric;
using kelstat_test::Upper;
using kelstat_test::worstScaledError;
using Vector = std::vector<double>;

constexpr double kEpsilon = std::numeric_limits<double>::epsilon();

// ---- Result kinds, as tables: one row per left operand, columns dense, symmetric, upper,
// diagonal for the right operand.
template <class A, class B>
using Sum = decltype(std::declval<const A&>() + std::declval<const B&>());
template <class A, class B>
using Difference = decltype(std::declval<const A&>() - std::declval<const B&>());
template <class A, class B>
using Product = decltype(std::declval<const A&>() * std::declval<const B&>());

template <template <class, class> class Op, class Left, class E0, class E1, class E2, class E3>
constexpr bool kRow =
    std::is_same_v<Op<Left, Dense>, E0>&& std::is_same_v<Op<Left, Symmetric>, E1>&&
        std::is_same_v<Op<Left, Upper>, E2>&& std::is_same_v<Op<Left, Diagonal>, E3>;

template <template <class, class> class Op>
constexpr bool kSumTable = kRow<Op, Dense, Dense, Dense, Dense, Dense>&&
    kRow<Op, Symmetric, Dense, Symmetric, Dense, Symmetric>&&
        kRow<Op, Upper, Dense, Dense, Upper, Upper>&&
            kRow<Op, Diagonal, Dense, Symmetric, Upper, Diagonal>;
static_assert(kSumTable<Sum>);
static_assert(kSumTable<Difference>);

static_assert(kRow<Product, Dense, Dense, Dense, Dense, Dense>);
static_assert(kRow<Product, Symmetric, Dense, Dense, Dense, Dense>);
static_assert(kRow<Product, Upper, Dense, Dense, Upper, Upper>);
static_assert(kRow<Product, Diagonal, Dense, Dense, Upper, Diagonal>);

template <class K>
constexpr bool kScalarKeepsKind = std::is_same_v<decltype(2.0 * std::declval<const K&>()), K>&&
    std::is_same_v<decltype(std::declval<const K&>() * 2.0), K>;
static_assert(kScalarKeepsKind<Dense> && kScalarKeepsKind<Symmetric> && kScalarKeepsKind<Upper> &&
              kScalarKeepsKind<Diagonal>);

static_assert(
    std::is_same_v<decltype(std::declval<const Dense&>() * std::declval<const Vector&>()), Dense>);
static_assert(std::is_same_v<
              decltype(std::declval<const Symmetric&>() * std::declval<const Vector&>()), Dense>);

// ---- Values over every pair of kinds.
template <class K>
struct KindTag {
    using type = K;
};

template <class Visit>
void forEachKind(Visit visit) {
    visit(KindTag<Dense>(), "dense");
    visit(KindTag<Symmetric>(), "symmetric");
    visit(KindTag<Upper>(), "upper");
    visit(KindTag<Diagonal>(), "diagonal");
}

template <class Visit>
void forEachPair(Visit visit) {
    forEachKind([&](auto left, const char* leftName) {
        forEachKind([&](auto right, const char* rightName) {
            visit(left, right, std::string(leftName) + " with " + rightName);
        });
    });
}

// Order 11: not a multiple of the product's tile edge, so edge tiles are cut.
constexpr int kOrder = 11;

// Positions where the dense forms differ (compared bit for bit).
int countDifferences(const Dense& actual, const Dense& expected) {
    if (actual.rowCount() != expected.rowCount() || actual.colCount() != expected.colCount()) {
        return -1;
    }
    int differences = 0;
    for (int i = 0; i < actual.rowCount(); ++i) {
        for (int j = 0; j < actual.colCount(); ++j) {
            if (!(actual(i, j) == expected(i, j))) ++differences;
        }
    }
    return differences;
}

TEST(MatrixArithmetic, SumsAndDifferencesAreElementwiseForEveryPair) {
    std::mt19937_64 engine(20261123);
    forEachPair([&](auto left, auto right, const std::string& pair) {
        using L = typename decltype(left)::type;
        using R = typename decltype(right)::type;
        const L a = randomOfKind<L>(kOrder, kOrder, engine);
        const R b = randomOfKind<R>(kOrder, kOrder, engine);
        const Dense denseA(a);
        const Dense denseB(b);
        Dense expectedSum(kOrder, kOrder);
        Dense expectedDifference(kOrder, kOrder);
        for (int i = 0; i < kOrder; ++i) {
            for (int j = 0; j < kOrder; ++j) {
                expectedSum(i, j) = denseA(i, j) + denseB(i, j);
                expectedDifference(i, j) = denseA(i, j) - denseB(i, j);
            }
        }
        EXPECT_EQ(countDifferences(Dense(a + b), expectedSum), 0) << pair;
        EXPECT_EQ(countDifferences(Dense(a - b), expectedDifference), 0) << pair;
    });
}

TEST(MatrixArithmetic, ProductsMatchThePlainLoopForEveryPair) {
    std::mt19937_64 engine(7);
    forEachPair([&](auto left, auto right, const std::string& pair) {
        using L = typename decltype(left)::type;
        using R = typename decltype(right)::type;
        // Real values: equal up to rounding of sums of kOrder terms.
        const L a = randomOfKind<L>(kOrder, kOrder, engine);
        const R b = randomOfKind<R>(kOrder, kOrder, engine);
        EXPECT_LE(worstScaledError(Dense(a * b), Dense(a), Dense(b)), 2 * kOrder * kEpsilon)
            << pair;
        // Integer values: every partial sum is exact, so any order of summation gives the same.
        const L integerA = randomOfKind<L>(kOrder, kOrder, engine, true);
        const R integerB = randomOfKind<R>(kOrder, kOrder, engine, true);
        EXPECT_EQ(countDifferences(Dense(integerA * integerB),
                                   referenceProduct(Dense(integerA), Dense(integerB))),
                  0)
            << pair;
    });
}

TEST(MatrixArithmetic, TiledProductAgreesWithSlowMultiply) {
    std::mt19937_64 engine(99);
    struct Shape {
        int rows, inner, cols;
    };
    const Shape shapes[] = {{20, 20, 20}, {1, 1, 1}, {13, 20, 7},
                            {8, 16, 24},  {3, 0, 4}, {17, 9, 1}};
    for (const Shape& s : shapes) {
        const Dense a = randomOfKind<Dense>(s.rows, s.inner, engine);
        const Dense b = randomOfKind<Dense>(s.inner, s.cols, engine);
        const Dense slow = SlowMatrixMultiply(a, b);
        // The slow product is the plain loop, bit for bit.
        EXPECT_EQ(countDifferences(slow, referenceProduct(a, b)), 0) << s.rows << "x" << s.inner;
        EXPECT_LE(worstScaledError(a * b, a, b), 2 * s.inner * kEpsilon)
            << s.rows << "x" << s.inner;

        const Dense integerA = randomOfKind<Dense>(s.rows, s.inner, engine, true);
        const Dense integerB = randomOfKind<Dense>(s.inner, s.cols, engine, true);
        EXPECT_EQ(countDifferences(integerA * integerB, SlowMatrixMultiply(integerA, integerB)), 0);

        Dense inPlace(integerA);
        inPlace *= integerB;
        EXPECT_EQ(countDifferences(inPlace, SlowMatrixMultiply(integerA, integerB)), 0);
    }
}

TEST(MatrixArithmetic, InPlaceProductsAndSelfProduct) {
    std::mt19937_64 engine(5);
    Dense a = randomOfKind<Dense>(9, 9, engine, true);
    const Dense square = SlowMatrixMultiply(a, a);
    a *= a;
    EXPECT_EQ(countDifferences(a, square), 0);

    Diagonal d = randomOfKind<Diagonal>(4, 4, engine);
    const Diagonal e = randomOfKind<Diagonal>(4, 4, engine);
    const Diagonal product = d * e;
    d *= e;
    EXPECT_EQ(countDifferences(Dense(d), Dense(product)), 0);

    Dense withDiagonal = randomOfKind<Dense>(4, 4, engine);
    const Dense expected = withDiagonal + e;
    withDiagonal += e;
    EXPECT_EQ(countDifferences(withDiagonal, expected), 0);
    withDiagonal -= e;
    EXPECT_EQ(countDifferences(withDiagonal - e + e, withDiagonal), 0);
}

TEST(MatrixArithmetic, ScalarProductsScaleEveryElement) {
    std::mt19937_64 engine(11);
    const double factor = -0.3;
    forEachKind([&](auto kind, const char* name) {
        using K = typename decltype(kind)::type;
        const K a = randomOfKind<K>(6, 6, engine);
        Dense expected(a);
        for (int i = 0; i < 6; ++i) {
            for (int j = 0; j < 6; ++j) expected(i, j) = factor * expected(i, j);
        }
        EXPECT_EQ(countDifferences(Dense(factor * a), expected), 0) << name;
        EXPECT_EQ(countDifferences(Dense(a * factor), expected), 0) << name;
    });
}

TEST(MatrixArithmetic, TransposedProductsNeverNeedTheTranspose) {
    std::mt19937_64 engine(3);
    const Dense a = randomOfKind<Dense>(7, 5, engine);
    const Dense b = randomOfKind<Dense>(7, 3, engine);
    const Dense c = randomOfKind<Dense>(4, 5, engine);
    Dense result(2, 2, 42.0);  // resized and overwritten
    multiplyLeftTranspose(a, b, result);
    EXPECT_EQ(result.rowCount(), 5);
    EXPECT_EQ(result.colCount(), 3);
    EXPECT_LE(worstScaledError(result, a.transpose(), b), 2 * 7 * kEpsilon);
    multiplyRightTranspose(a, c, result);
    EXPECT_EQ(result.rowCount(), 7);
    EXPECT_EQ(result.colCount(), 4);
    EXPECT_LE(worstScaledError(result, a, c.transpose()), 2 * 5 * kEpsilon);
}

TEST(MatrixArithmetic, MatrixAndVector) {
    std::mt19937_64 engine(13);
    const Dense a = randomOfKind<Dense>(4, 3, engine);
    const Symmetric s = randomOfKind<Symmetric>(3, 3, engine);
    const Vector x = {0.5, -2.0, 3.0};
    const Dense column(x, 1);
    EXPECT_EQ(countDifferences(a * x, referenceProduct(a, column)), 0);
    EXPECT_EQ(countDifferences(s * x, referenceProduct(Dense(s), column)), 0);

    Dense replaced(a);
    replaced *= x;
    EXPECT_EQ(countDifferences(replaced, a * x), 0);

    const Dense base = randomOfKind<Dense>(3, 1, engine);
    Dense expectedSum(3, 1);
    Dense expectedDifference(3, 1);
    for (int i = 0; i < 3; ++i) {
        expectedSum(i, 0) = base(i, 0) + x[i];
        expectedDifference(i, 0) = base(i, 0) - x[i];
    }
    EXPECT_EQ(countDifferences(base + x, expectedSum), 0);
    EXPECT_EQ(countDifferences(x + base, expectedSum), 0);
    EXPECT_EQ(countDifferences(base - x, expectedDifference), 0);
}

TEST(MatrixArithmetic, DotProductsOverLeadingRows) {
    const Dense a(Vector{1, 2, 3, 4, 5, 6, 7, 8, 9}, 3);
    EXPECT_EQ(DotProduct(a, 0, 2, 3), 1 * 3 + 4 * 6 + 7 * 9);
    EXPECT_EQ(DotProduct(a, 1, 1, 2), 2 * 2 + 5 * 5);
    EXPECT_EQ(DotProduct(a, 1, 2, 0), 0.0);
    EXPECT_EQ(DotProduct(a, 2, Vector{1, -1, 10}, 3), 3 - 6 + 90);
    EXPECT_EQ(DotProduct(a, 0, Vector{}, 0), 0.0);
}

// r' (b a b')^-1 r with r = b x - y, the weight solved here by LU rather than Cholesky.
double weightedResidual(const Dense& a, const Dense& b, const Vector& x, const Vector& y) {
    Dense residual = b * x;
    residual -= y;
    Vector weighted;
    EXPECT_TRUE(
        LUDecomposition(b * a * b.transpose()).Solve(residual.ConvertToVector(), &weighted));
    double sum = 0.0;
    for (int i = 0; i < residual.rowCount(); ++i) sum += residual(i, 0) * weighted[i];
    return sum;
}

TEST(MatrixArithmetic, QuadraticFormsOfAResidual) {
    std::mt19937_64 engine(17);
    const Symmetric a = kelstat_test::randomPositiveDefinite(4, engine);
    const Dense b = randomOfKind<Dense>(3, 4, engine);
    const Vector x = {1.0, -0.5, 0.25, 2.0};
    const Vector y = {0.3, 0.1, -0.7};
    const double expected = weightedResidual(Dense(a), b, x, y);
    EXPECT_NEAR(mQuadraticForm(a, b, x, y), expected, 1e-12 * std::fabs(expected));
    EXPECT_NEAR(mQuadraticForm(Dense(a), b, x, y), expected, 1e-12 * std::fabs(expected));

    const Dense negative = -Dense(a);
    EXPECT_EQ(messageOf<MatrixSingular>([&] { mQuadraticForm(negative, b, x, y); }),
              "Matrix is singular");
}

// ---- Shape checks: the message of each, and nothing changed by an in-place operator that throws.
TEST(MatrixArithmetic, ShapeMismatchMessages) {
    const std::string rows = " : row counts are different";
    const std::string cols = " : col counts are different";
    const std::string orders = "Matrix multiplication: incompatible orders";
    const Dense d23(2, 3, 1.0);
    const Dense d32(3, 2, 1.0);
    const Dense d33(3, 3, 1.0);
    const Symmetric s3(3, 1.0);
    const Upper u3(3, 1.0);
    const Upper u4(4, 1.0);
    const Diagonal g2(2, 1.0);
    const Diagonal g3(3, 1.0);
    const Vector v2(2, 1.0);
    struct Case {
        const char* what;
        std::function<void()> action;
        std::string message;
    };
    const Case cases[] = {
        {"dense + symmetric", [&] { d23 + s3; }, "matrix addition" + rows},
        {"dense - symmetric", [&] { d23 - s3; }, "matrix addition" + rows},
        {"dense + symmetric, columns", [&] { d32 + s3; }, "matrix addition" + cols},
        {"dense + dense", [&] { d23 + d32; }, "matrix addition" + rows},
        {"symmetric - diagonal", [&] { s3 - g2; }, "matrix addition" + rows},
        {"upper + upper", [&] { u3 + u4; }, "upper matrix element wise op" + rows},
        {"diagonal - upper", [&] { g2 - u3; }, "upper matrix element wise op" + rows},
        {"diagonal + diagonal", [&] { g2 + g3; }, "diagonal matrix elementwise op" + rows},
        {"dense += diagonal",
         [&] {
             Dense t(2, 2);
             t += g3;
         },
         "matrix += diagonal" + rows},
        {"dense -= diagonal",
         [&] {
             Dense t(3, 2);
             t -= g3;
         },
         "matrix += diagonal" + cols},
        {"dense * dense", [&] { d23* d23; }, orders},
        {"slow dense * dense", [&] { SlowMatrixMultiply(d23, d23); }, orders},
        {"dense *= dense",
         [&] {
             Dense t(d23);
             t *= d23;
         },
         orders},
        {"symmetric * dense", [&] { s3* d23; }, orders},
        {"dense * diagonal", [&] { d23* g2; }, orders},
        {"upper * upper", [&] { u3* u4; }, orders},
        {"diagonal * diagonal", [&] { g2* g3; }, orders},
        {"diagonal *= diagonal",
         [&] {
             Diagonal t(g2);
             t *= g3;
         },
         orders},
        {"a' b",
         [&] {
             Dense r;
             multiplyLeftTranspose(d23, d32, r);
         },
         orders},
        {"a b'",
         [&] {
             Dense r;
             multiplyRightTranspose(d23, d32, r);
         },
         orders},
        {"dense * vector", [&] { d33* v2; }, "matrix and vector must be of same order"},
        {"symmetric * vector", [&] { s3* v2; }, "matrix and vector must be of same order"},
        {"dense *= vector",
         [&] {
             Dense t(d33);
             t *= v2;
         },
         "matrix and vector must be of same order"},
        {"column += vector",
         [&] {
             Dense t(3, 1);
             t += v2;
         },
         "op+= matrix and vector must be of same order"},
        {"row + vector", [&] { Dense(1, 2) + v2; }, "op+= matrix and vector must be of same order"},
        {"vector + column", [&] { v2 + Dense(3, 1); },
         "op+= matrix and vector must be of same order"},
        {"column - vector", [&] { Dense(3, 1) - v2; },
         "op-= matrix and vector must be of same order"},
        {"dot product of columns", [&] { DotProduct(d23, 0, 1, 3); },
         "matrix::number of products greater than dimension"},
        {"dot product with vector", [&] { DotProduct(d32, 0, Vector(4), 4); },
         "matrix::number of products greater than dimension"},
        {"quadratic form, not square", [&] { mQuadraticForm(d23, d23, Vector(3), Vector(2)); },
         "matrix::quadratic form is only defined for square matrices"},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(messageOf<MatrixException>(c.action), c.message) << c.what;
    }

    Dense unchanged(2, 2, 1.5);
    EXPECT_THROW(unchanged += g3, MatrixException);
    EXPECT_EQ(countDifferences(unchanged, Dense(2, 2, 1.5)), 0);

    // Dense += dense is the member, which asserts instead.
    EXPECT_EQ(messageOf<vek::allege::AllegeException>([&] { Dense(d23) += d32; }),
              "assertion failed: (m_ == other.m_ && n_ == other.n_) src/matrix/matrix_impl: 236");
}

}  // namespace
