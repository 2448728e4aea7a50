// Writes tests/data/bratio_reference.csv: I_x(a, b) and its complement at 50 significant digits,
// with the relative condition number of each, over grids that reach every method of BRATIO.
//
// Build and run (from the repository root; header-only Boost, nothing from the library):
//   g++ -O2 -std=c++17 tests/gen/bratio_reference.cpp -o /tmp/bratio_reference
//   /tmp/bratio_reference > tests/data/bratio_reference.csv
// It takes a minute or two. The output is deterministic.
#include <algorithm>
#include <boost/math/special_functions/beta.hpp>
#include <boost/multiprecision/cpp_bin_float.hpp>
#include <cmath>
#include <cstdio>
#include <random>
#include <string>
#include <vector>

#include "../support/wide_oracle.h"

namespace {

using Real = kelstat_test::Wide;
using QuietPolicy = kelstat_test::QuietPolicy;

// The two arguments as BRATIO receives them. When x + y = 1 cannot hold exactly in double (the
// smaller one below 2^-54), the smaller one is exact and defines the reference.
struct Point {
    std::string regime;
    double a;
    double b;
    double x;
    double y;
};

// From the smaller of x and y, given as `small`; `smallIsX` says which one it is.
Point makeOrientedPoint(const std::string& regime, double a, double b, double small,
                        bool smallIsX) {
    const double large = 1.0 - small;
    // Make the pair sum to exactly 1 where doubles allow it.
    if (1.0 - large > 0.0) small = 1.0 - large;
    return smallIsX ? Point{regime, a, b, small, large} : Point{regime, a, b, large, small};
}

Point makePoint(const std::string& regime, double a, double b, double x) {
    return x <= 0.5 ? makeOrientedPoint(regime, a, b, x, true)
                    : makeOrientedPoint(regime, a, b, 1.0 - x, false);
}

// The point with 1 - x = y, for y given directly (x near 1).
Point makePointFromY(const std::string& regime, double a, double b, double y) {
    return y < 0.5 ? makeOrientedPoint(regime, a, b, y, false)
                   : makeOrientedPoint(regime, a, b, 1.0 - y, true);
}

struct Tails {
    Real w;
    Real w1;
};

Tails referenceTails(const Real& a, const Real& b, const Point& p) {
    if (p.x <= p.y) {
        const Real x(p.x);
        return {boost::math::ibeta(a, b, x, QuietPolicy()),
                boost::math::ibetac(a, b, x, QuietPolicy())};
    }
    const Real y(p.y);
    return {boost::math::ibetac(b, a, y, QuietPolicy()),
            boost::math::ibeta(b, a, y, QuietPolicy())};
}

// |shape * d(tail)/d(shape)|, by a central difference at 50 digits on the smaller tail.
Real shapeSensitivity(const Point& p, bool differentiateA, bool useLowerTail) {
    const Real h("1e-15");
    const Real a(p.a);
    const Real b(p.b);
    const Real up = differentiateA ? a * (1 + h) : a;
    const Real down = differentiateA ? a * (1 - h) : a;
    const Real upB = differentiateA ? b : b * (1 + h);
    const Real downB = differentiateA ? b : b * (1 - h);
    const Tails plus = referenceTails(up, upB, p);
    const Real& plusTail = useLowerTail ? plus.w : plus.w1;
    const Tails minus = referenceTails(down, downB, p);
    const Real& minusTail = useLowerTail ? minus.w : minus.w1;
    return abs((plusTail - minusTail) / (2 * h));
}

void writeRow(const Point& p) {
    const Real a(p.a);
    const Real b(p.b);
    const Tails tails = referenceTails(a, b, p);
    const bool lowerIsSmaller = tails.w <= tails.w1;
    const Real sensitivity =
        shapeSensitivity(p, true, lowerIsSmaller) + shapeSensitivity(p, false, lowerIsSmaller);
    // The density times the smaller of x and y: the effect of one relative rounding in the input.
    const Real density = p.x <= p.y ? boost::math::ibeta_derivative(a, b, Real(p.x), QuietPolicy())
                                    : boost::math::ibeta_derivative(b, a, Real(p.y), QuietPolicy());
    const Real inputEffect = density * Real(std::min(p.x, p.y));
    const Real total = sensitivity + inputEffect;
    const double conditionW = tails.w > 0 ? static_cast<double>(total / tails.w) : 0.0;
    const double conditionW1 = tails.w1 > 0 ? static_cast<double>(total / tails.w1) : 0.0;
    std::printf("%s,%.17g,%.17g,%.17g,%.17g,%s,%s,%.3e,%.3e\n", p.regime.c_str(), p.a, p.b, p.x,
                p.y, tails.w.str(40, std::ios_base::scientific).c_str(),
                tails.w1.str(40, std::ios_base::scientific).c_str(), conditionW, conditionW1);
}

std::vector<Point> buildGrid() {
    std::vector<Point> points;
    std::mt19937_64 random(20261123);
    std::uniform_real_distribution<double> unit(0.0, 1.0);
    const auto logUniform = [&](double low, double high) {
        return std::exp(std::log(low) + (std::log(high) - std::log(low)) * unit(random));
    };

    // A shape tiny (fpser, apser, bpser), either one, down to 1e-20, and both tiny.
    for (double tiny : {1e-20, 1e-16, 1e-12, 1e-6}) {
        for (double other : {0.5, 1.0, 3.0, 60.0, 2e4}) {
            for (double x : {1e-9, 0.03, 0.3, 0.8, 0.999}) {
                points.push_back(makePoint("tiny_shape", tiny, other, x));
                points.push_back(makePoint("tiny_shape", other, tiny, x));
            }
        }
    }
    // apser at extreme x: its first-order truncation in the tiny shape grows with |ln x|.
    for (double tiny : {3e-16, 9e-16}) {
        for (double other : {0.5, 50.0, 3e4}) {
            for (double x : {1e-100, 1e-200, 1e-300}) {
                points.push_back(makePoint("tiny_shape_far_tail", tiny, other, x));
                points.push_back(makePointFromY("tiny_shape_far_tail", other, tiny, x));
            }
        }
    }
    for (double x : {1e-5, 0.2, 0.5, 0.9}) {
        points.push_back(makePoint("tiny_shape", 1e-20, 3e-19, x));
        points.push_back(makePoint("tiny_shape", 2e-17, 1e-16, x));
    }

    // Both shapes below 1 (bpser on either tail, bup + bgrat).
    for (double a : {0.02, 0.15, 0.5, 0.95}) {
        for (double b : {0.01, 0.3, 0.7, 1.0}) {
            for (double x : {1e-6, 0.1, 0.25, 0.5, 0.75, 0.95}) {
                points.push_back(makePoint("both_below_one", a, b, x));
            }
        }
    }

    // One shape below 1, the other moderate to large (bpser, bup + bgrat, bgrat alone).
    for (double small : {0.05, 0.5, 0.9}) {
        for (double large : {5.0, 20.0, 200.0, 1e4, 1e6}) {
            for (double scaledX : {1e-4, 0.05, 0.5, 2.0, 10.0}) {
                const double x = std::min(scaledX / large, 0.97);
                points.push_back(makePoint("one_small_one_large", small, large, x));
                points.push_back(makePointFromY("one_small_one_large", large, small, x));
            }
        }
    }

    // Both moderate, 1 < a, b < 40 (bpser, bup + bpser, bup + bgrat, bfrac), integers included.
    for (int i = 0; i < 70; ++i) {
        const double a = logUniform(1.01, 40.0);
        const double b = logUniform(1.01, 40.0);
        points.push_back(makePoint("moderate", a, b, unit(random)));
    }
    for (double a : {2.0, 7.0, 25.0}) {
        for (double b : {3.0, 16.0, 39.0}) {
            for (double x : {0.1, 0.6, 0.85}) points.push_back(makePoint("moderate", a, b, x));
        }
    }

    // Both large, x near the mean (basym): lambda within 3% of the smaller shape.
    const double largePairs[][2] = {{150, 150}, {150, 2000}, {1e3, 1e4}, {5e3, 5e3},
                                    {1e4, 3e5}, {1e5, 1e5},  {1e6, 2e5}, {1e6, 1e6}};
    for (const auto& pair : largePairs) {
        const double a = pair[0];
        const double b = pair[1];
        const double mean = a / (a + b);
        const double spread = std::sqrt(a * b / ((a + b) * (a + b) * (a + b + 1.0)));
        for (double k : {-4.0, -2.0, -0.7, -0.1, 0.0, 0.1, 0.7, 2.0, 4.0}) {
            points.push_back(makePoint("large_near_mean", a, b, mean + k * spread));
        }
    }

    // Both large, away from the mean (bfrac), down into the far tails.
    for (int i = 0; i < 60; ++i) {
        const double a = logUniform(40.0, 1e6);
        const double b = logUniform(40.0, 1e6);
        const double mean = a / (a + b);
        const double spread = std::sqrt(a * b / ((a + b) * (a + b) * (a + b + 1.0)));
        const double k = (unit(random) < 0.5 ? -1.0 : 1.0) * logUniform(2.0, 40.0);
        const double x = mean + k * spread;
        if (x > 0.0 && x < 1.0) points.push_back(makePoint("large_away_from_mean", a, b, x));
    }

    // x near 0 and y near 0.
    for (double tiny : {1e-300, 1e-200, 1e-100, 1e-30, 1e-12}) {
        for (double shape : {0.2, 1.0, 2.5}) {
            for (double other : {0.7, 4.0, 300.0}) {
                points.push_back(makePoint("x_near_zero", shape, other, tiny));
                points.push_back(makePointFromY("y_near_zero", other, shape, tiny));
            }
        }
    }

    // Results from 1e-10 down to 1e-305: x solves I_x(a, b) = target in double precision.
    const double tailPairs[][2] = {{0.5, 5.0}, {2.0, 3.0},   {10.0, 200.0}, {100.0, 1000.0},
                                   {3.0, 0.7}, {50.0, 50.0}, {400.0, 30.0}};
    for (const auto& pair : tailPairs) {
        for (double target : {1e-10, 1e-50, 1e-100, 1e-200, 1e-280, 1e-300, 1e-305}) {
            const double x = boost::math::ibeta_inv(pair[0], pair[1], target, QuietPolicy());
            if (x > 0.0 && x < 1.0) {
                points.push_back(makePoint("deep_tail", pair[0], pair[1], x));
                points.push_back(makePointFromY("deep_tail", pair[1], pair[0], x));
            }
        }
    }
    return points;
}

}  // namespace

int main() {
    std::printf(
        "# Regularized incomplete beta function: w = I_x(a, b) and w1 = 1 - I_x(a, b), "
        "40 significant digits.\n"
        "# Source: Boost.Math 1.74 ibeta and ibetac in boost::multiprecision::cpp_bin_float_50, "
        "written by tests/gen/bratio_reference.cpp.\n"
        "# x + y = 1 exactly, except where the smaller of x and y is below 2^-54: that one is "
        "exact "
        "and defines the reference.\n"
        "# cond_w, cond_w1: relative condition number of each value in a, b and min(x, y) "
        "(sum of |d ln value / d ln input|).\n"
        "regime,a,b,x,y,w,w1,cond_w,cond_w1\n");
    for (const Point& point : buildGrid()) writeRow(point);
    return 0;
}
