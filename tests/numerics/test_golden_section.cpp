#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "counted_function.h"
#include "numerics/golden_section.h"

namespace kelstat {
namespace {

using testing::counted;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

TEST(GoldenSection, FindsMinimaOfUnimodalFunctions) {
    struct Case {
        const char* name;
        double (*function)(double);
        double a, b, minimum, tolerance;
    };
    const Case cases[] = {
        {"shifted square", [](double x) { return (x - 1.0) * (x - 1.0); }, 0.0, 3.0, 1.0, 1e-11},
        {"near 0.3", [](double x) { return (x - 0.3) * (x - 0.3); }, 0.0, 1.0, 0.3, 1e-11},
        // A flat minimum is only located to about the square root of the value's precision.
        {"cosh", [](double x) { return std::cosh(x - 40.0); }, -100.0, 100.0, 40.0, 1e-6},
        {"increasing", [](double x) { return x; }, 2.0, 5.0, 2.0, 1e-11},
        {"decreasing", [](double x) { return -x; }, 2.0, 5.0, 5.0, 1e-11},
        {"negative side", [](double x) { return std::fabs(x + 2.5); }, -10.0, 1.0, -2.5, 1e-11},
    };
    for (const Case& c : cases) {
        auto f = counted(c.function);
        EXPECT_NEAR(calcGoldenSection(c.a, c.b, f, false), c.minimum, c.tolerance) << c.name;
    }
}

TEST(GoldenSection, OneNewEvaluationPerStep) {
    auto f = counted([](double x) { return (x - 1.0) * (x - 1.0); });
    EXPECT_NEAR(calcGoldenSection(0.0, 3.0, f, false), 1.0, 1e-11);
    EXPECT_EQ(f.calls(), 59);
}

// The first two points come from the stored ratios; forming the short ratio as 1 - r would put
// the first point two ulps lower.
TEST(GoldenSection, FirstPointsUseStoredRatios) {
    auto f = counted([](double x) { return x * x; });
    calcGoldenSection(0.0, 1.0, f, false);
    ASSERT_GE(f.calls(), 3);
    EXPECT_EQ(f.arguments[0], 0.3819660112501052);
    EXPECT_EQ(f.arguments[1], 0.6180339887498949);
    // f rises beyond the short point, so the kept point moves up unchanged and the next new
    // point is formed from the new interval [0, r].
    EXPECT_EQ(f.arguments[2], 0.3819660112501052 * 0.6180339887498949);
}

TEST(GoldenSection, EmptyInterval) {
    auto f = counted([](double x) { return x * x; });
    EXPECT_EQ(calcGoldenSection(1.5, 1.5, f, false), 1.5);
    EXPECT_EQ(f.calls(), 2);
}

TEST(GoldenSection, NaNAtFirstPointsGivesNaN) {
    auto nanFirst = counted([](double x) { return x < 0.5 ? kNaN : x; });
    EXPECT_TRUE(std::isnan(calcGoldenSection(0.0, 1.0, nanFirst, false)));
    EXPECT_EQ(nanFirst.calls(), 2);
    auto nanSecond = counted([](double x) { return x > 0.5 ? kNaN : x; });
    EXPECT_TRUE(std::isnan(calcGoldenSection(0.0, 1.0, nanSecond, false)));
    EXPECT_EQ(nanSecond.calls(), 2);
}

TEST(GoldenSection, LaterNaNMovesTowardsUpperEnd) {
    auto f = counted([](double x) { return x > 0.7 ? kNaN : -x; });
    EXPECT_NEAR(calcGoldenSection(0.0, 1.0, f, false), 1.0, 1e-11);
}

// With the minimum at 0 neither argument test need ever hold; the search stops at its step limit
// with the midpoint of the collapsed interval.
TEST(GoldenSection, MinimumAtZeroStops) {
    auto f = counted([](double x) { return x * x; });
    const double result = calcGoldenSection(-1.0, 2.0, f, false);
    EXPECT_LT(std::fabs(result), 1e-20);
    EXPECT_LE(f.calls(), 10002);
}

TEST(GoldenSection, IntegerEnding) {
    auto f = counted([](double x) { return (x - 2.6) * (x - 2.6); });
    EXPECT_EQ(calcGoldenSection(0.0, 10.0, f, true), 3.0);
    auto g = counted([](double x) { return (x - 7.2) * (x - 7.2); });
    EXPECT_EQ(calcGoldenSection(0.0, 10.0, g, true), 7.0);
    auto decreasing = counted([](double x) { return -x; });  // the walk stops at f's step limit
    EXPECT_GT(calcGoldenSection(0.0, 10.0, decreasing, true), 10.0);
}

}  // namespace
}  // namespace kelstat
