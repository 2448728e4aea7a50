#include <gtest/gtest.h>

#include <algorithm>
#include <boost/multiprecision/cpp_bin_float.hpp>
#include <cmath>
#include <limits>
#include <random>

#include "specfun/extended_power.h"
#include "wide_oracle.h"

namespace {

using kelstat::wholePower;
using kelstat_test::Wide;

// The ratios z / S(z) of the smallest-extreme-value density lie around 1; the gamma tails' bases
// run over many binades. Every exponent up to the extended range, and a few beyond it.
TEST(WholePower, WithinAboutHalfAnUlpOfTheExactPower) {
    std::mt19937_64 generator(7);
    std::uniform_real_distribution<double> mantissa(0.5, 2.0);
    double worst = 0.0;
    for (int exponent = 0; exponent <= 70; ++exponent) {
        for (int i = 0; i < 300; ++i) {
            const double base = std::ldexp(mantissa(generator), i % 9 - 4);
            const double value = wholePower(base, exponent);
            if (!std::isnormal(value)) continue;
            const Wide exact = boost::multiprecision::pow(Wide(base), exponent);
            const double ulp = std::ldexp(1.0, std::ilogb(value) - 52);
            worst = std::max(worst, static_cast<double>(abs(Wide(value) - exact) / ulp));
        }
    }
    EXPECT_LT(worst, 0.52);
}

TEST(WholePower, EdgesFollowPow) {
    constexpr double kInfinity = std::numeric_limits<double>::infinity();
    EXPECT_EQ(wholePower(0.0, 0.0), 1.0);
    EXPECT_EQ(wholePower(0.0, 20.0), 0.0);
    EXPECT_EQ(wholePower(2.0, 64.0), std::ldexp(1.0, 64));
    EXPECT_EQ(wholePower(1e20, 20.0), kInfinity);  // overflows the double range, not the extended
    EXPECT_EQ(wholePower(1e-20, 20.0), 0.0);
    EXPECT_TRUE(std::isnan(wholePower(std::numeric_limits<double>::quiet_NaN(), 3.0)));
    EXPECT_EQ(wholePower(kInfinity, 3.0), kInfinity);
    EXPECT_EQ(wholePower(1.5, 1000.0), std::pow(1.5, 1000.0));
}

}  // namespace
