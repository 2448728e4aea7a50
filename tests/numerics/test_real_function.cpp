#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "numerics/real_function.h"

namespace kelstat {
namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// A function object that exposes the protected tolerances, so that the tests can set them as a
// derived class of the library would.
class Linear : public ZRXRealFunction {
  public:
    double operator()(double x) override { return x; }
    void setIntegerX(bool integerX) { mIntegerX = integerX; }
    void setScaleForF(double scale) { mScaleForF = scale; }
    void setAbsoluteToleranceForX(double tolerance) { mAbsoluteToleranceForX = tolerance; }
    double scaleForF() const { return mScaleForF; }
};

// Overrides the relative argument tolerance through its getter only.
class LooseArgument : public Linear {
  public:
    double mGetRelativeToleranceForX() const override { return 0.1; }
};

TEST(RealFunction, DefaultTolerances) {
    const Linear f;
    EXPECT_FALSE(f.mGetIntegerX());
    EXPECT_EQ(f.scaleForF(), 0.0);
    EXPECT_EQ(f.mGetAbsoluteToleranceForX(), 1e-30);
    EXPECT_EQ(f.mGetRelativeToleranceForX(), 1e-12);
    EXPECT_EQ(f.mGetAbsoluteToleranceForF(), 1e-30);
    EXPECT_EQ(f.mGetRelativeToleranceForF(), 1e-12);
}

TEST(RealFunction, ArgumentConvergence) {
    struct Case {
        double x1, x2;
        bool integerX, expected;
    };
    const Case cases[] = {
        {0.0, 0.0, false, true},           // 1e-30 > 0
        {0.0, 1e-30, false, false},        // both comparisons are strict
        {0.0, 9e-31, false, true},         // below the absolute tolerance
        {1.0, 1.0 + 5e-13, false, true},   // relative part
        {1.0, 1.0 + 2e-12, false, false},  //
        {-1e6, -1e6 - 5e-7, false, true},  // magnitudes, not signed values
        {kNaN, 1.0, false, false},         // NaN never converges
        {1.0, kNaN, false, false},         //
        {3.0, 4.0, true, true},            // integer neighbours
        {3.0, 5.0, true, false},           //
        {0.0, 1e-31, true, true},          // integer mode: the spacing test decides
        {1e14, 1e14 + 50.0, true, true},   // relative part still applies in integer mode
    };
    for (const Case& c : cases) {
        Linear f;
        f.setIntegerX(c.integerX);
        EXPECT_EQ(f.mIsConvergedForX(c.x1, c.x2), c.expected)
            << c.x1 << " " << c.x2 << " integer " << c.integerX;
    }
}

TEST(RealFunction, IntegerModeIgnoresAbsoluteTolerance) {
    Linear f;
    f.setIntegerX(true);
    f.setAbsoluteToleranceForX(10.0);
    EXPECT_FALSE(f.mIsConvergedForX(3.0, 6.0));
    f.setIntegerX(false);
    EXPECT_TRUE(f.mIsConvergedForX(3.0, 6.0));
}

TEST(RealFunction, ArgumentTestUsesOverriddenGetter) {
    const LooseArgument f;
    EXPECT_TRUE(f.mIsConvergedForX(10.0, 10.5));
    EXPECT_FALSE(Linear().mIsConvergedForX(10.0, 10.5));
}

TEST(RealFunction, ValueConvergence) {
    Linear f;
    EXPECT_TRUE(f.mIsConvergedForF(0.0));
    EXPECT_TRUE(f.mIsConvergedForF(1e-30));
    EXPECT_TRUE(f.mIsConvergedForF(-1e-30));
    EXPECT_FALSE(f.mIsConvergedForF(2e-30));
    EXPECT_FALSE(f.mIsConvergedForF(kNaN));
    f.setScaleForF(-1e6);  // the scale counts by magnitude: 1e6 * 1e-12
    EXPECT_TRUE(f.mIsConvergedForF(1e-6));
    EXPECT_FALSE(f.mIsConvergedForF(1.1e-6));
}

TEST(RealFunction, AssignmentCopiesTolerances) {
    Linear source;
    source.setIntegerX(true);
    source.setScaleForF(7.0);
    source.setAbsoluteToleranceForX(0.5);
    Linear target;
    ZRXRealFunction& base = target;
    EXPECT_EQ(&(base = source), &base);
    EXPECT_TRUE(target.mGetIntegerX());
    EXPECT_EQ(target.scaleForF(), 7.0);
    EXPECT_EQ(target.mGetAbsoluteToleranceForX(), 0.5);

    base = target;  // to itself
    EXPECT_TRUE(target.mGetIntegerX());
    EXPECT_EQ(target.scaleForF(), 7.0);
    EXPECT_EQ(target.mGetAbsoluteToleranceForX(), 0.5);
    EXPECT_EQ(target.mGetRelativeToleranceForF(), 1e-12);
}

TEST(FuzzyComparison, EqualWithinFuzz) {
    struct Case {
        double a, b, fuzz;
        bool expected;
    };
    const Case cases[] = {
        {0.0, 0.0, 0.0, true},           {1e-31, 0.0, 0.0, true},        {1e-29, 0.0, 0.0, false},
        {1.0 + 5e-13, 1.0, 0.0, true},   {1.0 + 2e-12, 1.0, 0.0, false}, {-1.0, 1.0, 0.0, false},
        {4e-14, 0.0, 5.0, true},    // absolute part 5e-14
        {6e-14, 0.0, 5.0, false},   //
        {4e-14, 0.0, -5.0, false},  // a negative fuzz narrows the tolerance
        {1.0, 1.0, -5.0, true},     // 1e-12 - 5e-14 still covers 0
        {1.0 + 1e-12, 1.0, -5.0, false}, {kNaN, 1.0, 0.0, false},        {1.0, kNaN, 0.0, false},
        {1.0, 1.0, kNaN, false},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(equalWithinFuzz(c.a, c.b, c.fuzz), c.expected)
            << c.a << " " << c.b << " fuzz " << c.fuzz;
    }
}

TEST(FuzzyComparison, FuzzMax) {
    EXPECT_EQ(getFuzzMax(5.0), 5.0 * 1e-14);
    EXPECT_EQ(getFuzzMax(-2.0), -2.0 * 1e-14);
}

TEST(FuzzyComparison, CompareFunction) {
    struct Case {
        double first, second;
        bool active, preferSmaller, expected;
    };
    const Case cases[] = {
        {1.0, 2.0, true, false, false},
        {2.0, 1.0, true, false, true},
        {1.0, 2.0, true, true, true},
        {2.0, 1.0, true, true, false},
        {2.0, 1.0, false, false, false},
        {1.0, 2.0, false, true, false},
        {kNaN, 1.0, false, true, false},
        {kNaN, 1.0, true, true, true},  // a NaN first counts as good
        {1.0, kNaN, true, true, false},
        {1.0, kNaN, true, false, false},
        {1.0, 1.0 + 5e-13, true, false, true},  // equal within the fuzz
        {0.0, 1e-31, true, false, true},
        {0.0, 1e-29, true, false, false},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(mCompareFunction(c.first, c.second, c.active, c.preferSmaller), c.expected)
            << c.first << " " << c.second << " " << c.active << c.preferSmaller;
    }
}

}  // namespace
}  // namespace kelstat
