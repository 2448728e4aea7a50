// Digamma and scaled polygamma functions against Boost.Math at 50 digits and the reference table
// tests/data/psi_reference.csv.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <boost/math/special_functions/bernoulli.hpp>
#include <boost/math/special_functions/digamma.hpp>
#include <boost/math/special_functions/factorials.hpp>
#include <boost/math/special_functions/polygamma.hpp>
#include <boost/multiprecision/cpp_bin_float.hpp>
#include <cmath>
#include <limits>
#include <vector>

#include "reference_table.h"
#include "specfun/polygamma.h"
#include "specfun/polygamma_table.h"

namespace {

using Real = boost::multiprecision::cpp_bin_float_50;
using kelstat::psi;
using kelstat::XDPSIFN;

constexpr double kPsiRoot = 1.4616321449683622;

double relativeError(double value, const Real& reference) {
    return static_cast<double>(abs((Real(value) - reference) / reference));
}

// (-1)^(k+1) psi^(k)(x) / k!, the k-th member of XDPSIFN's sequence for kode 1.
Real scaledPolygamma(int order, double x) {
    const Real derivative =
        order == 0 ? boost::math::digamma(Real(x)) : boost::math::polygamma(order, Real(x));
    const Real scaled = derivative / boost::math::factorial<Real>(static_cast<unsigned>(order));
    return order % 2 == 0 ? Real(-scaled) : scaled;
}

TEST(Polygamma, BernoulliTableHoldsTheCorrectlyRoundedNumbers) {
    using kelstat::polygamma_table::kBernoulli;
    EXPECT_EQ(kBernoulli[0], 1.0);
    EXPECT_EQ(kBernoulli[1], -0.5);
    for (std::size_t j = 2; j < kBernoulli.size(); ++j) {
        const Real exact = boost::math::bernoulli_b2n<Real>(static_cast<int>(j - 1));
        EXPECT_EQ(kBernoulli[j], static_cast<double>(exact)) << "B_" << 2 * (j - 1);
    }
}

TEST(Polygamma, PsiKnownValues) {
    constexpr double kEulerGamma = 0.57721566490153286;
    EXPECT_NEAR(psi(1.0), -kEulerGamma, 1e-15 * kEulerGamma);
    EXPECT_NEAR(psi(0.5), -1.9635100260214235, 1e-15 * 1.9635100260214235);
    EXPECT_NEAR(psi(2.0), 1.0 - kEulerGamma, 1e-15 * (1.0 - kEulerGamma));
}

TEST(Polygamma, PsiMatchesReferenceTable) {
    const auto rows = kelstat_test::readReferenceTable("psi_reference.csv");
    ASSERT_GE(rows.size(), 40u);
    double worst = 0.0;
    double worstX = 0.0;
    for (const auto& row : rows) {
        const double x = row[0];
        const double error = std::fabs((psi(x) - row[1]) / row[1]);
        if (error > worst) {
            worst = error;
            worstX = x;
        }
    }
    EXPECT_LE(worst, 1e-15) << "worst at x = " << worstX;
}

// Dense sweep over the recurrence (x < 9) and the expansion alone (x >= 9): relative error away
// from the root, absolute error next to it, where the value passes through 0.
TEST(Polygamma, PsiSweepAgainstBoost) {
    double worstRelative = 0.0;
    double worstRelativeX = 0.0;
    double worstAbsoluteNearRoot = 0.0;
    const auto check = [&](double x) {
        const Real reference = boost::math::digamma(Real(x));
        const double value = psi(x);
        if (std::fabs(x - kPsiRoot) < 0.05) {
            worstAbsoluteNearRoot =
                std::max(worstAbsoluteNearRoot, static_cast<double>(abs(Real(value) - reference)));
        } else if (relativeError(value, reference) > worstRelative) {
            worstRelative = relativeError(value, reference);
            worstRelativeX = x;
        }
    };
    for (double logX = -12.0; logX <= 12.0; logX += 0.0037) check(std::pow(10.0, logX));
    for (double x = 1.0; x <= 2.0; x += 0.000731) check(x);
    EXPECT_LE(worstRelative, 1e-15) << "worst at x = " << worstRelativeX;
    EXPECT_LE(worstAbsoluteNearRoot, 5e-17);
    RecordProperty("worst_relative_error", kelstat_test::scientific(worstRelative));
    RecordProperty("worst_absolute_error_near_root",
                   kelstat_test::scientific(worstAbsoluteNearRoot));
}

TEST(Polygamma, PsiOutsideTheDomain) {
    EXPECT_EQ(psi(0.0), 0.0);
    EXPECT_EQ(psi(-2.5), 0.0);
    EXPECT_TRUE(std::isnan(psi(std::numeric_limits<double>::quiet_NaN())));
    // The largest arguments: psi(x) = ln x - 1/(2x) - ..., with 1/x^2 underflowing.
    EXPECT_NEAR(psi(1e300), 690.77552789821368, 1e-12);
    EXPECT_NEAR(psi(std::numeric_limits<double>::max()), 709.78271289338397, 1e-12);
    EXPECT_EQ(psi(std::numeric_limits<double>::infinity()),
              std::numeric_limits<double>::infinity());
}

// Sequences of several members starting at orders 0..40, across the tiny-argument formula, the
// direct series, the expansion with recurrence, and the expansion alone.
TEST(Polygamma, ScaledSequencesMatchBoost) {
    constexpr int kMembers = 4;
    const std::vector<double> arguments = {1e-17, 1e-9, 3e-4, 0.05, 0.6,   1.0, 2.5,
                                           7.9,   9.3,  14.0, 40.0, 333.3, 1e5};
    double worst = 0.0;
    for (int n = 0; n <= 40; n += 4) {
        for (double x : arguments) {
            std::array<double, kMembers> ans{};
            int nz = -1;
            int ierr = -1;
            XDPSIFN(x, n, 1, kMembers, ans.data(), &nz, &ierr);
            if (ierr == 2) continue;  // x^-(n+k+1) overflows: covered below
            ASSERT_EQ(ierr, 0) << "n = " << n << ", x = " << x;
            for (int k = 0; k < kMembers - nz; ++k) {
                const double error = relativeError(ans[k], scaledPolygamma(n + k, x));
                worst = std::max(worst, error);
                EXPECT_LE(error, 2e-15) << "order " << n + k << ", x = " << x;
            }
        }
    }
    RecordProperty("worst_relative_error", kelstat_test::scientific(worst));
}

TEST(Polygamma, KodeTwoRemovesTheLogarithm) {
    for (double x : {1e-20, 0.3, 2.0, 8.5, 12.0, 1e6}) {
        double ans = 0.0;
        int nz = 0;
        int ierr = 0;
        XDPSIFN(x, 0, 2, 1, &ans, &nz, &ierr);
        ASSERT_EQ(ierr, 0);
        const Real reference = log(Real(x)) - boost::math::digamma(Real(x));
        EXPECT_LE(relativeError(ans, reference), 4e-15) << "x = " << x;
    }
    // For higher orders kode 2 changes nothing.
    std::array<double, 2> plain{};
    std::array<double, 2> scaled{};
    int nz = 0;
    int ierr = 0;
    XDPSIFN(3.7, 1, 1, 2, plain.data(), &nz, &ierr);
    XDPSIFN(3.7, 1, 2, 2, scaled.data(), &nz, &ierr);
    EXPECT_EQ(plain, scaled);
}

struct BadArgumentCase {
    double x;
    int n;
    int kode;
    int m;
};

TEST(Polygamma, BadArgumentsAreFlaggedAndLeaveTheOutputAlone) {
    const std::vector<BadArgumentCase> cases = {
        {0.0, 0, 1, 1},
        {-1.0, 0, 1, 1},
        {2.0, -1, 1, 1},
        {2.0, 0, 0, 1},
        {2.0, 0, 3, 1},
        {2.0, 0, 1, 0},
        {-std::numeric_limits<double>::infinity(), 0, 1, 1}};
    for (const auto& c : cases) {
        std::array<double, 2> ans = {7.0, 7.0};
        int nz = 5;
        int ierr = 0;
        XDPSIFN(c.x, c.n, c.kode, c.m, ans.data(), &nz, &ierr);
        EXPECT_EQ(ierr, 1) << "x = " << c.x << ", n = " << c.n << ", kode = " << c.kode;
        EXPECT_EQ(nz, 0);
        EXPECT_EQ(ans[0], 7.0);
    }

    std::array<double, 2> ans = {7.0, 7.0};
    int nz = 5;
    int ierr = 0;
    XDPSIFN(std::numeric_limits<double>::quiet_NaN(), 0, 1, 2, ans.data(), &nz, &ierr);
    EXPECT_EQ(ierr, 1);
    EXPECT_TRUE(std::isnan(ans[0]) && std::isnan(ans[1]));
}

TEST(Polygamma, OverflowForTinyArgumentsAndHighOrders) {
    std::array<double, 3> ans{};
    int nz = 9;
    int ierr = 0;
    XDPSIFN(1e-300, 2, 1, 3, ans.data(), &nz, &ierr);  // (1e-300)^-5 overflows
    EXPECT_EQ(ierr, 2);
    EXPECT_EQ(nz, 0);
}

TEST(Polygamma, UnderflowingMembersAreZeroedFromTheTop) {
    // (n+1) ln 100 passes the exponent bound (about 700.6) from order 152 on: of orders 150..153
    // the last two are set to 0 and counted, the rest computed.
    std::array<double, 4> ans = {-1.0, -1.0, -1.0, -1.0};
    int nz = -1;
    int ierr = -1;
    XDPSIFN(100.0, 150, 1, 4, ans.data(), &nz, &ierr);
    EXPECT_EQ(ierr, 0);
    EXPECT_EQ(nz, 2);
    EXPECT_EQ(ans[2], 0.0);
    EXPECT_EQ(ans[3], 0.0);
    for (int k = 0; k < 2; ++k) {
        EXPECT_LE(relativeError(ans[k], scaledPolygamma(150 + k, 100.0)), 1e-14) << k;
    }

    // Every member underflowing leaves all of them 0.
    std::array<double, 2> none = {-1.0, -1.0};
    XDPSIFN(1e10, 60, 1, 2, none.data(), &nz, &ierr);
    EXPECT_EQ(ierr, 0);
    EXPECT_EQ(nz, 2);
    EXPECT_EQ(none[0], 0.0);
    EXPECT_EQ(none[1], 0.0);
}

}  // namespace
