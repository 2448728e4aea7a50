// Normal K-factors against 30-digit references, the cached two-sided evaluation against the
// straightforward one (bit for bit), and the normal model's limits.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <iterator>
#include <string>
#include <vector>

#include "numerics/gauss_legendre.h"
#include "tolerance/gauss_legendre_36_table.h"
#include "tolerance/normal_model.h"
#include "tolerance_test_support.h"

namespace kelstat {
namespace {

using testing::bitsOf;
using testing::isQuietNaN;
using testing::readCsv;
using testing::relativeError;

TEST(NormalKFactorTest, MatchThirtyDigitReferences) {
    const auto rows = readCsv("tolerance_normal_kfactors.csv");
    ASSERT_EQ(rows.size(), 135u);  // 15 sample sizes from 2 to 10000, 3 x 3 levels
    double worstOneSided = 0.0;
    double worstTwoSided = 0.0;
    std::string worstOneCase;
    std::string worstTwoCase;
    for (const auto& row : rows) {
        const double n = std::stod(row[0]);
        const double alpha = 1.0 - std::stod(row[1]);
        const double proportion = std::stod(row[2]);
        const std::string label = row[0] + " " + row[1] + " " + row[2];
        const double oneSided =
            relativeError(normalOneSidedKFactor(n, alpha, proportion), std::stod(row[3]));
        const double twoSided =
            relativeError(normalTwoSidedKFactor(n, alpha, proportion), std::stod(row[4]));
        if (!(oneSided <= worstOneSided)) worstOneSided = oneSided, worstOneCase = label;
        if (!(twoSided <= worstTwoSided)) worstTwoSided = twoSided, worstTwoCase = label;
    }
    EXPECT_LE(worstOneSided, 1e-12)
        << "worst one-sided case n, confidence, proportion: " << worstOneCase;
    // The root is accepted at 1e-12 relative in 1/K, so the factor carries about that much.
    EXPECT_LE(worstTwoSided, 1e-11)
        << "worst two-sided case n, confidence, proportion: " << worstTwoCase;
}

// Values quoted with the method's own worked examples.
TEST(NormalKFactorTest, WorkedExamples) {
    struct Case {
        double n, confidence, proportion;
        bool twoSided;
        double expected, tolerance;
    };
    const Case cases[] = {
        {2, 0.95, 0.90, true, 31.09, 0.005},
        {10, 0.95, 0.90, true, 2.856, 0.0005},
        {10, 0.95, 0.90, false, 2.355, 0.0005},
        {30, 0.95, 0.99, true, 3.355, 0.0005},
    };
    for (const Case& c : cases) {
        const double alpha = 1.0 - c.confidence;
        const double k = c.twoSided ? normalTwoSidedKFactor(c.n, alpha, c.proportion)
                                    : normalOneSidedKFactor(c.n, alpha, c.proportion);
        EXPECT_NEAR(k, c.expected, c.tolerance) << c.n << " " << c.twoSided;
    }
}

TEST(NormalKFactorTest, StoredRuleIsTheQuadratureRoutinesOutputBitForBit) {
    std::vector<double> nodes;
    std::vector<double> weights;
    ASSERT_TRUE(findGaussianQuadratureWeights(36, nodes, weights));
    ASSERT_EQ(nodes.size(), std::size(kNormalKFactorRule));
    for (std::size_t i = 0; i < nodes.size(); ++i) {
        EXPECT_EQ(std::memcmp(&nodes[i], &kNormalKFactorRule[i].node, sizeof(double)), 0) << i;
        EXPECT_EQ(std::memcmp(&weights[i], &kNormalKFactorRule[i].weight, sizeof(double)), 0) << i;
    }
}

TEST(NormalKFactorTest, CachedNodeValuesChangeNoBit) {
    for (double n : {2.0, 3.0, 7.0, 10.0, 31.0, 100.0, 999.0, 10000.0}) {
        for (double alpha : {0.10, 0.05, 0.01}) {
            for (double proportion : {0.90, 0.95, 0.99}) {
                const double cached = normalTwoSidedKFactor(n, alpha, proportion, true);
                const double fresh = normalTwoSidedKFactor(n, alpha, proportion, false);
                EXPECT_EQ(bitsOf(cached), bitsOf(fresh)) << n << " " << alpha << " " << proportion;
            }
        }
        NormalKFactorIntegralFunction cached(n, 0.9, 0.05);
        NormalKFactorIntegralFunction fresh(n, 0.9, 0.05);
        cached.cacheNodeValues();
        for (double t = 0.001; t < 3.0; t *= 1.7) {
            EXPECT_EQ(bitsOf(cached(t)), bitsOf(fresh.evaluateAfresh(t))) << n << " " << t;
            EXPECT_EQ(bitsOf(cached(t)), bitsOf(fresh(t))) << n << " " << t;  // repeated call
        }
    }
}

TEST(NormalKFactorTest, FactorsFallWithSampleSizeAndRiseWithTheRequest) {
    double previousTwo = HUGE_VAL;
    double previousOne = HUGE_VAL;
    for (double n = 2; n <= 4096; n *= 2) {
        const double two = normalTwoSidedKFactor(n, 0.05, 0.9);
        const double one = normalOneSidedKFactor(n, 0.05, 0.9);
        EXPECT_LT(two, previousTwo) << n;
        EXPECT_LT(one, previousOne) << n;
        EXPECT_LT(one, two) << n;
        EXPECT_GT(normalTwoSidedKFactor(n, 0.01, 0.9), two) << n;
        EXPECT_GT(normalTwoSidedKFactor(n, 0.05, 0.95), two) << n;
        previousTwo = two;
        previousOne = one;
    }
}

TEST(NormalKFactorTest, UnusableRequestsGiveNaN) {
    for (double n : {0.0, 1.0, std::nan("")}) {
        EXPECT_TRUE(isQuietNaN(normalTwoSidedKFactor(n, 0.05, 0.9))) << n;
        EXPECT_TRUE(isQuietNaN(normalOneSidedKFactor(n, 0.05, 0.9))) << n;
    }
    EXPECT_TRUE(std::isnan(normalOneSidedKFactor(10, 0.05, 1.5)));
    EXPECT_TRUE(std::isnan(normalOneSidedKFactor(10, 1.5, 0.9)));
}

TEST(NormalModelTest, LimitsAreMeanMinusAndPlusKTimesTheStandardDeviation) {
    const double sample[] = {9.8, 10.4, 10.1, 9.6, 10.9, 10.0, 9.7, 10.2, 10.5, 9.9};
    NormalModelTI model(sample, 10, 0.05, 0.95, kel_TwoSided);
    EXPECT_EQ(model.executeToleranceInterval(kel_TwoSided, 0.95, 0.90), 0);
    EXPECT_NEAR(model.location, 10.11, 1e-13);
    const double variance = 1.449 / 9.0;  // sum of squared deviations over n - 1
    EXPECT_NEAR(model.scale, std::sqrt(variance), 1e-13);
    const double k = normalTwoSidedKFactor(10, 1.0 - 0.95, 0.90);
    EXPECT_EQ(model.lowerKFactor, k);
    EXPECT_EQ(model.upperKFactor, k);
    EXPECT_EQ(model.lowerLimit, model.location - k * model.scale);
    EXPECT_EQ(model.upperLimit, k * model.scale + model.location);
}

TEST(NormalModelTest, SummaryStatisticsGiveTheSameLimits) {
    NormalModelTI model(10, 5.0, 2.0, 0.05, 0.95, kel_TwoSided);
    EXPECT_EQ(model.executeToleranceInterval(kel_TwoSided, 0.95, 0.90), 0);
    EXPECT_EQ(model.location, 5.0);
    EXPECT_EQ(model.scale, 2.0);
    EXPECT_NEAR(model.lowerLimit, 5.0 - 2.0 * 2.856, 2e-3);
    EXPECT_NEAR(model.upperLimit, 5.0 + 2.0 * 2.856, 2e-3);
    EXPECT_DOUBLE_EQ(model.upperLimit - 5.0, 5.0 - model.lowerLimit);
}

TEST(NormalModelTest, TooFewObservationsLeaveFactorsAndLimitsNaN) {
    const double one[] = {3.0};
    for (uint32_t count : {0u, 1u}) {
        for (kel_ConfidenceType type : {kel_LowerBound, kel_TwoSided, kel_UpperBound}) {
            NormalModelTI model(one, count, 0.05, 0.95, kel_TwoSided);
            EXPECT_EQ(model.executeToleranceInterval(type, 0.95, 0.9), 0);
            for (double value :
                 {model.lowerKFactor, model.upperKFactor, model.lowerLimit, model.upperLimit}) {
                EXPECT_TRUE(isQuietNaN(value)) << count << " " << type;
            }
            if (count == 0) {
                EXPECT_TRUE(isQuietNaN(model.location));
            }
        }
    }
}

}  // namespace
}  // namespace kelstat
