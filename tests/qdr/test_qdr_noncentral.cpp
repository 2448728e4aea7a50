// Noncentral quantiles: the one-degree-of-freedom chi-square route against Boost's noncentral
// chi-square at 50 digits, the noncentral t against 20-digit quadrature references.
#include <gtest/gtest.h>

#include <boost/math/distributions/non_central_chi_squared.hpp>
#include <boost/math/distributions/students_t.hpp>
#include <boost/multiprecision/cpp_bin_float.hpp>
#include <cmath>
#include <fstream>
#include <limits>
#include <sstream>
#include <string>
#include <vector>

#include "qdr.h"
#include "wide_oracle.h"

namespace {

using Wide = kelstat_test::Wide;
using QuietPolicy = kelstat_test::QuietPolicy;

constexpr double kEpsilon = std::numeric_limits<double>::epsilon();

// Relative error of a computed quantile x, from the 50-digit distribution function and density
// at x: (F(x) - p) / (x f(x)) to first order.
template <typename Distribution>
double quantileError(const Distribution& distribution, double x, double p) {
    const Wide cdf = boost::math::cdf(distribution, Wide(x));
    const Wide density = boost::math::pdf(distribution, Wide(x));
    return static_cast<double>(boost::multiprecision::abs((cdf - p) / (density * x)));
}

TEST(QdrChiSquareOneDf, QuantileMatchesFiftyDigitNoncentralChiSquare) {
    double worst = 0.0;
    std::string worstCase;
    for (double lambda : {1e-6, 0.02, 0.5, 3.0, 34.5, 1000.0}) {
        const boost::math::non_central_chi_squared_distribution<Wide, QuietPolicy> exact(1, lambda);
        for (double p : {1e-9, 0.01, 0.3, 0.5, 0.9, 0.95, 0.99, 0.999999}) {
            const double x = qdr_GetChiSqInvCdf(p, 1.0, lambda);
            const double error = quantileError(exact, x, p) / kEpsilon;
            if (error > worst) {
                worst = error;
                worstCase = "p=" + std::to_string(p) + " lambda=" + std::to_string(lambda);
            }
        }
    }
    EXPECT_LE(worst, 4.0) << worstCase;
}

TEST(QdrChiSquareOneDf, QuantileAtTheNormalKFactorNodes) {
    // The two-sided normal factor asks for r^2 at noncentralities x^2 / n, x up to 8.3.
    double worst = 0.0;
    for (double n : {2.0, 20.0, 1000.0}) {
        for (double node : {0.01, 0.9, 3.3, 8.3}) {
            const double lambda = node * node / n;
            const boost::math::non_central_chi_squared_distribution<Wide, QuietPolicy> exact(
                1, lambda);
            for (double p : {0.9, 0.99}) {
                const double x = qdr_GetChiSqInvCdf(p, 1.0, lambda);
                worst = std::max(worst, quantileError(exact, x, p) / kEpsilon);
            }
        }
    }
    EXPECT_LE(worst, 4.0);
}

TEST(QdrChiSquare, NoncentralQuantileForOtherDegreesOfFreedom) {
    double worst = 0.0;
    for (double df : {2.0, 5.5, 40.0}) {
        for (double lambda : {0.5, 10.0}) {
            const boost::math::non_central_chi_squared_distribution<Wide, QuietPolicy> exact(
                df, lambda);
            for (double p : {0.05, 0.5, 0.95}) {
                worst = std::max(worst, quantileError(exact, qdr_GetChiSqInvCdf(p, df, lambda), p));
            }
            const double x = df + lambda;
            const double lower = qdr_GetChiSqCdf(QDR_LOWER_TAIL, x, df, lambda);
            const double upper = qdr_GetChiSqCdf(QDR_UPPER_TAIL, x, df, lambda);
            EXPECT_NEAR(lower, static_cast<double>(boost::math::cdf(exact, Wide(x))), 1e-15);
            EXPECT_NEAR(upper, static_cast<double>(boost::math::cdf(complement(exact, Wide(x)))),
                        1e-15);
        }
    }
    EXPECT_LE(worst, 1e-14);
}

struct TReference {
    double p;
    double df;
    double ncp;
    long double quantile;
};

std::vector<TReference> readTReferences() {
    std::ifstream in(std::string(KELSTAT_TEST_DATA_DIR) + "/qdr_nct_quantiles.csv");
    std::vector<TReference> rows;
    std::string line;
    while (std::getline(in, line)) {
        if (line.empty() || line[0] == '#' || line[0] == 'p') {
            continue;
        }
        std::istringstream fields(line);
        std::string p, df, ncp, quantile;
        std::getline(fields, p, ',');
        std::getline(fields, df, ',');
        std::getline(fields, ncp, ',');
        std::getline(fields, quantile, ',');
        rows.push_back({std::stod(p), std::stod(df), std::stod(ncp), std::stold(quantile)});
    }
    return rows;
}

TEST(QdrNoncentralT, QuantileMatchesQuadratureReferences) {
    const std::vector<TReference> rows = readTReferences();
    ASSERT_EQ(rows.size(), 45u);
    double worst = 0.0;
    std::string worstCase;
    for (const TReference& row : rows) {
        const double q = qdr_GetTInvCdf(row.p, row.df, row.ncp);
        const double error =
            static_cast<double>(std::fabs((q - row.quantile) / row.quantile)) / kEpsilon;
        if (!(error <= worst)) {
            worst = error;
            worstCase = "p=" + std::to_string(row.p) + " df=" + std::to_string(row.df) +
                        " ncp=" + std::to_string(row.ncp) + " got " + std::to_string(q);
        }
    }
    EXPECT_LE(worst, 8.0) << worstCase;
}

TEST(QdrNoncentralT, CentralQuantileAndReflection) {
    for (double df : {1.0, 3.5, 30.0, 1e5}) {
        const boost::math::students_t_distribution<Wide, QuietPolicy> exact(df);
        for (double p : {0.001, 0.2, 0.5, 0.975}) {
            const double t = qdr_GetTInvCdf(p, df, 0.0);
            EXPECT_NEAR(t, static_cast<double>(boost::math::quantile(exact, Wide(p))),
                        8 * kEpsilon * std::fabs(t));
        }
    }
    // T(-delta) is distributed as -T(delta).
    for (double ncp : {0.7, 12.0, 300.0}) {
        const double right = qdr_GetTInvCdf(0.9, 49.0, ncp);
        const double left = qdr_GetTInvCdf(0.1, 49.0, -ncp);
        EXPECT_NEAR(right, -left, 4 * kEpsilon * std::fabs(right)) << ncp;
    }
    // Infinite degrees of freedom leave the normal.
    EXPECT_DOUBLE_EQ(qdr_GetTInvCdf(0.975, std::numeric_limits<double>::infinity(), 1.0),
                     1.0 + 1.959963984540054);
}

TEST(QdrNoncentralT, HugeNoncentralitiesFinishWithoutHanging) {
    // Large samples with extreme noncentralities must converge; beyond what can be computed the
    // answer is NaN rather than a long wait.
    const double wide = qdr_GetTInvCdf(0.99, 999999.0, -4600.0);
    EXPECT_TRUE(std::isfinite(wide));
    EXPECT_NEAR(wide, -4592.09560923898, 1e-9 * 4600.0);
    EXPECT_TRUE(std::isfinite(qdr_GetTInvCdf(0.95, 1e7, 2e4)));
    const double hopeless = qdr_GetTInvCdf(0.95, 1.0, 1e6);
    EXPECT_TRUE(std::isnan(hopeless) || hopeless > 1e6);
}

}  // namespace

namespace {

// Extreme but legal arguments: every answer is a number of the right sign, an overflow to
// infinity, or NaN; never an exception (which could not cross the C interface) and never a hang.
TEST(QdrExtremes, QuantilesFinishWithSensibleAnswers) {
    for (double p : {1e-300, 0.5, 1.0 - 1e-16}) {
        for (double df : {1e-3, 1.0, 7.0, 1e7}) {
            for (double ncp : {-1e4, 30.0, 4e3}) {
                const double t = qdr_GetTInvCdf(p, df, ncp);
                if (p >= 0.5 && ncp > 0.0) {
                    EXPECT_FALSE(t < 0.0) << p << " " << df << " " << ncp;
                }
            }
            for (double lambda : {0.0, 2.0, 1e10}) {
                const double x = qdr_GetChiSqInvCdf(p, df, lambda);
                EXPECT_FALSE(x < 0.0) << p << " " << df << " " << lambda;
                EXPECT_EQ(std::isnan(x), df != 1.0 && lambda > 1e9) << p << " " << df;
            }
        }
    }
    // One degree of freedom stays exact at any noncentrality through the normal tails.
    EXPECT_NEAR(qdr_GetChiSqCdf(QDR_LOWER_TAIL, 1e20, 1.0, 1e20), 0.5, 1e-9);
    EXPECT_NEAR(qdr_GetChiSqCdf(QDR_UPPER_TAIL, 4.0, 1.0, 1e-300), std::erfc(M_SQRT2), 1e-16);
    EXPECT_TRUE(std::isnan(qdr_GetChiSqCdf(QDR_LOWER_TAIL, 1e12, 3.0, 1e12)));
}

}  // namespace
