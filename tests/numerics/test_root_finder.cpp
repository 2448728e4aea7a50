#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "counted_function.h"
#include "numerics/root_finder.h"

namespace kelstat {
namespace {

using testing::counted;
using testing::countedInteger;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInf = std::numeric_limits<double>::infinity();
const double kPi = std::acos(-1.0);

TEST(RootFinder, ExactSecantPointEndsAtOnce) {
    auto f = counted([](double x) { return x - 0.3; });
    EXPECT_EQ(ZRXRootFinder(0.0, 1.0, f), 0.3);
    EXPECT_EQ(f.calls(), 3);
}

TEST(RootFinder, SmoothRootsBothWaysRound) {
    struct Case {
        const char* name;
        double (*function)(double);
        double low, high, root;
    };
    const Case cases[] = {
        {"cos", [](double x) { return std::cos(x); }, 0.0, 3.0, kPi / 2.0},
        {"square minus two", [](double x) { return x * x - 2.0; }, 0.0, 2.0, std::sqrt(2.0)},
        {"exp minus ten", [](double x) { return std::exp(x) - 10.0; }, -5.0, 20.0, std::log(10.0)},
        {"cubic far right", [](double x) { return x * x * x - 1e6; }, 1.0, 1e3, 100.0},
        {"negative root", [](double x) { return std::tanh(x + 7.25); }, -40.0, 3.0, -7.25},
    };
    for (const Case& c : cases) {
        auto forward = counted(c.function);
        auto reversed = counted(c.function);
        const double fromLow = ZRXRootFinder(c.low, c.high, forward);
        const double fromHigh = ZRXRootFinder(c.high, c.low, reversed);
        EXPECT_NEAR(fromLow, c.root, 1e-12 * std::fabs(c.root)) << c.name;
        EXPECT_NEAR(fromHigh, c.root, 1e-12 * std::fabs(c.root)) << c.name;
        EXPECT_LT(forward.calls(), 200) << c.name;
    }
}

// The value kept at the end that stays is halved on every iteration, not only when the same end
// stays twice: for x^2 - 2 on (0, 2) the third secant point is then 4/3, not 1.5.
TEST(RootFinder, HalvesTheStayingEndEveryIteration) {
    auto f = counted([](double x) { return x * x - 2.0; });
    ZRXRootFinder(0.0, 2.0, f);
    ASSERT_GE(f.calls(), 5);
    EXPECT_EQ(f.arguments[2], 1.0);
    EXPECT_EQ(f.arguments[3], 1.5);
    EXPECT_DOUBLE_EQ(f.arguments[4], 4.0 / 3.0);
}

TEST(RootFinder, RootAtZeroEndsThroughValueTest) {
    auto f = counted([](double x) { return x * x * x; });
    const double root = ZRXRootFinder(-1.0, 2.0, f);
    EXPECT_LE(std::fabs(root), 1e-10);
    EXPECT_LE(std::fabs(root * root * root), 1e-30);
}

TEST(RootFinder, EndsWithoutSignChange) {
    struct Case {
        double atLow, atHigh, expected;
    };
    // x0 = 1, x1 = 4; a zero counts as neither sign, and x0 is tried before x1.
    const Case cases[] = {
        {0.0, 5.0, 1.0},     {0.0, -5.0, 1.0},   {0.0, 0.0, 1.0},     {1e-31, 5.0, 1.0},
        {-1e-30, -5.0, 1.0}, {5.0, 0.0, 4.0},    {-1.0, -1e-31, 4.0}, {1.0, 5.0, kNaN},
        {-1.0, -5.0, kNaN},  {2e-30, 5.0, kNaN},
    };
    for (const Case& c : cases) {
        auto f = counted([&c](double x) { return x < 2.0 ? c.atLow : c.atHigh; });
        const double result = ZRXRootFinder(1.0, 4.0, f);
        if (std::isnan(c.expected)) {
            EXPECT_TRUE(std::isnan(result)) << c.atLow << " " << c.atHigh;
        } else {
            EXPECT_EQ(result, c.expected) << c.atLow << " " << c.atHigh;
        }
        EXPECT_EQ(f.calls(), 2);
    }
}

TEST(RootFinder, NaNAtAnEndStopsAfterTwoEvaluations) {
    auto nanLow = counted([](double x) { return x < 0.5 ? kNaN : 1.0; });
    EXPECT_TRUE(std::isnan(ZRXRootFinder(0.0, 1.0, nanLow)));
    EXPECT_EQ(nanLow.calls(), 2);
    auto nanHigh = counted([](double x) { return x < 0.5 ? 0.0 : kNaN; });
    EXPECT_TRUE(std::isnan(ZRXRootFinder(0.0, 1.0, nanHigh)));
    EXPECT_EQ(nanHigh.calls(), 2);
}

TEST(RootFinder, HostileFunctionsGiveNaNAndStop) {
    // A NaN inside the bracket.
    auto nanInside = counted([](double x) { return std::fabs(x) < 0.9 ? kNaN : x; });
    EXPECT_TRUE(std::isnan(ZRXRootFinder(-1.0, 1.0, nanInside)));
    EXPECT_EQ(nanInside.calls(), 3);
    // An infinite end pins every secant point to the finite end, so the loop makes no progress.
    auto infiniteEnd = counted([](double x) { return x > 9.0 ? kInf : -1.0; });
    EXPECT_TRUE(std::isnan(ZRXRootFinder(0.0, 10.0, infiniteEnd)));
    EXPECT_LT(infiniteEnd.calls(), 20000);
}

TEST(RootFinder, IntegerEnding) {
    struct Case {
        const char* name;
        double (*function)(double);
        double x0, x1, expected;
    };
    const Case cases[] = {
        // The first integer at or beyond the sign change, seen from the lower end.
        {"linear", [](double x) { return x - 2.5; }, 0.0, 10.0, 3.0},
        {"square", [](double x) { return x * x - 10.0; }, 0.0, 10.0, 4.0},
        {"square reversed", [](double x) { return x * x - 10.0; }, 10.0, 0.0, 4.0},
        {"decreasing", [](double x) { return 7.5 - x; }, 0.0, 100.0, 8.0},
        {"root on an integer", [](double x) { return x - 6.0; }, 0.0, 10.0, 6.0},
        // No sign change: the floor of the accepted end.
        {"zero at x0", [](double x) { return x < 3.0 ? 0.0 : 1.0; }, 2.7, 9.0, 2.0},
        {"zero at x1", [](double x) { return x < 3.0 ? 1.0 : 0.0; }, 0.5, 5.9, 5.0},
    };
    for (const Case& c : cases) {
        auto f = countedInteger(c.function);
        EXPECT_EQ(ZRXRootFinder(c.x0, c.x1, f), c.expected) << c.name;
    }
}

}  // namespace
}  // namespace kelstat
