#include <gtest/gtest.h>

#include <boost/multiprecision/cpp_bin_float.hpp>
#include <cmath>
#include <cstring>
#include <limits>
#include <random>
#include <vector>

#include "specfun/exponential.h"
#include "wide_oracle.h"

namespace {

using kelstat::DoublePair;
using kelstat::exponential;
using kelstat_test::Wide;

// Arguments from the whole working range, from the range the tolerance integrands use most, and
// tiny ones of every binade down to 2^-50 (where e^x - 1 is all the polynomial has to give).
std::vector<double> sampleArguments(std::size_t count) {
    std::mt19937_64 generator(20261123);
    std::uniform_real_distribution<double> wide(-708.0, 708.0);
    std::uniform_real_distribution<double> working(-40.0, 5.0);
    std::uniform_real_distribution<double> unit(-1.0, 1.0);
    std::vector<double> arguments;
    for (std::size_t i = 0; i < count; ++i) {
        switch (i % 3) {
            case 0:
                arguments.push_back(wide(generator));
                break;
            case 1:
                arguments.push_back(working(generator));
                break;
            default:
                arguments.push_back(std::ldexp(unit(generator), -static_cast<int>(i % 50)));
        }
    }
    return arguments;
}

bool sameBits(double a, double b) {
    return std::memcmp(&a, &b, sizeof a) == 0;
}

TEST(Exponential, WithinHalfAnUlpAndABitOfTheExactValue) {
    double worst = 0.0;
    double worstArgument = 0.0;
    for (const double x : sampleArguments(30000)) {
        const double value = exponential(x);
        const Wide exact = boost::multiprecision::exp(Wide(x));
        const double ulp = std::ldexp(1.0, std::ilogb(value) - 52);
        const double error = static_cast<double>(abs(Wide(value) - exact) / ulp);
        if (error > worst) {
            worst = error;
            worstArgument = x;
        }
    }
    EXPECT_LT(worst, 0.52) << "at x = " << worstArgument;
}

TEST(Exponential, PairGivesTheBitsOfTwoSingleCalls) {
    const std::vector<double> arguments = sampleArguments(20000);
    for (std::size_t i = 0; i + 1 < arguments.size(); i += 2) {
        const DoublePair pair = exponential(DoublePair{arguments[i], arguments[i + 1]});
        ASSERT_TRUE(sameBits(pair[0], exponential(arguments[i]))) << arguments[i];
        ASSERT_TRUE(sameBits(pair[1], exponential(arguments[i + 1]))) << arguments[i + 1];
    }
    // A lane outside the table's range sends both lanes through the single calls.
    const DoublePair mixed = exponential(DoublePair{-3.5, 800.0});
    EXPECT_TRUE(sameBits(mixed[0], exponential(-3.5)));
    EXPECT_EQ(mixed[1], std::numeric_limits<double>::infinity());
}

#ifdef KELSTAT_HAVE_AVX2_PATHS
[[gnu::target("avx2")]] void expectFourLanesLikeSingleCalls(const std::vector<double>& arguments) {
    using kelstat::DoubleQuad;
    for (std::size_t i = 0; i + 3 < arguments.size(); i += 4) {
        const DoubleQuad quad = exponential(
            DoubleQuad{arguments[i], arguments[i + 1], arguments[i + 2], arguments[i + 3]});
        for (std::size_t lane = 0; lane < 4; ++lane) {
            ASSERT_TRUE(sameBits(quad[lane], exponential(arguments[i + lane])))
                << arguments[i + lane];
        }
    }
}

TEST(Exponential, FourLanesGiveTheBitsOfSingleCalls) {
    if (!__builtin_cpu_supports("avx2")) GTEST_SKIP() << "no AVX2 on this processor";
    std::vector<double> arguments = sampleArguments(20000);
    // Lanes outside the table's range, alone and together with ordinary ones.
    for (const double x : {800.0, -1.5, std::numeric_limits<double>::quiet_NaN(), 3.25, -750.0,
                           -750.0, 709.0, 0.0}) {
        arguments.push_back(x);
    }
    expectFourLanesLikeSingleCalls(arguments);
}
#endif

TEST(Exponential, EndsOfTheRangeAndSpecialValues) {
    constexpr double kInfinity = std::numeric_limits<double>::infinity();
    EXPECT_EQ(exponential(0.0), 1.0);
    EXPECT_EQ(exponential(-0.0), 1.0);
    EXPECT_EQ(exponential(kInfinity), kInfinity);
    EXPECT_EQ(exponential(-kInfinity), 0.0);
    EXPECT_TRUE(std::isnan(exponential(std::numeric_limits<double>::quiet_NaN())));
    EXPECT_EQ(exponential(710.0), kInfinity);
    EXPECT_EQ(exponential(-746.0), 0.0);
    // Beyond +-708 the library function answers, subnormal results included.
    for (const double x : {708.0, -708.0, 709.5, -740.0, -745.0}) {
        EXPECT_TRUE(sameBits(exponential(x), std::exp(x))) << x;
    }
    // Just inside the range the results are normal and still close.
    for (const double x : {707.999999, -707.999999}) {
        const double value = exponential(x);
        EXPECT_TRUE(std::isnormal(value)) << x;
        EXPECT_NEAR(value / std::exp(x), 1.0, 4e-16) << x;
    }
}

}  // namespace
