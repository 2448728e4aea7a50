// Lognormal and gamma limits on fixed samples: the normal machinery on logarithms and cube
// roots, mapped back, and the gamma model's reporting of its maximum-likelihood fit.
#include <gtest/gtest.h>

#include <boost/math/special_functions/digamma.hpp>
#include <boost/math/special_functions/trigamma.hpp>
#include <cmath>
#include <numeric>
#include <vector>

#include "qdr.h"
#include "tolerance/lognormal_gamma_models.h"
#include "tolerance_test_support.h"

namespace kelstat {
namespace {

using testing::isQuietNaN;

using QuietPolicy = boost::math::policies::policy<
    boost::math::policies::domain_error<boost::math::policies::ignore_error>,
    boost::math::policies::pole_error<boost::math::policies::ignore_error>,
    boost::math::policies::overflow_error<boost::math::policies::ignore_error>,
    boost::math::policies::evaluation_error<boost::math::policies::ignore_error>>;

// Maximum-likelihood gamma (shape, scale) by Newton's method on
// log k - digamma(k) = log(mean) - mean(log x).
void fitGammaIndependently(const std::vector<double>& sample, double& shape, double& scale) {
    const double n = static_cast<double>(sample.size());
    const double mean = std::accumulate(sample.begin(), sample.end(), 0.0) / n;
    double meanLog = 0.0;
    for (double x : sample) meanLog += std::log(x) / n;
    const double target = std::log(mean) - meanLog;
    double k = 0.5 / target;
    for (int i = 0; i < 100; ++i) {
        const double g = std::log(k) - boost::math::digamma(k, QuietPolicy()) - target;
        const double slope = 1.0 / k - boost::math::trigamma(k, QuietPolicy());
        k -= g / slope;
    }
    shape = k;
    scale = mean / k;
}

TEST(LogNormalModelTest, WorksOnTheLogarithmsAndExponentiatesTheLimits) {
    const double sample[] = {1.0, std::exp(1.0), std::exp(2.0), std::exp(3.0), std::exp(4.0)};
    for (kel_ConfidenceType type : {kel_LowerBound, kel_TwoSided, kel_UpperBound}) {
        LogNormalModelTI model(sample, 5, 0.05, 0.95, kel_TwoSided);
        EXPECT_EQ(model.executeToleranceInterval(type, 0.95, 0.9), 0);
        EXPECT_TRUE(model.logTransformed);
        EXPECT_NEAR(model.location, 2.0, 1e-15);
        EXPECT_NEAR(model.scale, std::sqrt(2.5), 1e-15);
        const double k = type == kel_TwoSided ? normalTwoSidedKFactor(5, 1.0 - 0.95, 0.9)
                                              : normalOneSidedKFactor(5, 1.0 - 0.95, 0.9);
        if (type <= 0) {
            EXPECT_EQ(model.lowerKFactor, k);
            EXPECT_DOUBLE_EQ(model.lowerLimit, std::exp(2.0 - k * std::sqrt(2.5)));
        }
        if (type >= 0) {
            EXPECT_EQ(model.upperKFactor, k);
            EXPECT_DOUBLE_EQ(model.upperLimit, std::exp(2.0 + k * std::sqrt(2.5)));
        }
        if (type != kel_TwoSided) {
            EXPECT_EQ(model.lowerLimit, model.upperLimit);
        }
    }
}

TEST(LogNormalModelTest, NaNFactorsAreNotExponentiated) {
    const double sample[] = {2.0};
    LogNormalModelTI model(sample, 1, 0.05, 0.95, kel_TwoSided);
    model.executeToleranceInterval(kel_TwoSided, 0.95, 0.9);
    EXPECT_TRUE(isQuietNaN(model.lowerLimit));
    EXPECT_TRUE(isQuietNaN(model.upperLimit));
}

TEST(LogNormalModelTest, NonPositiveObservationsAreNotScreened) {
    const double sample[] = {0.0, 1.0, 2.0, 3.0};
    LogNormalModelTI model(sample, 4, 0.05, 0.95, kel_TwoSided);
    EXPECT_EQ(model.executeToleranceInterval(kel_TwoSided, 0.95, 0.9), 0);
    EXPECT_FALSE(std::isfinite(model.location));  // log 0 = -inf reaches the estimates
    EXPECT_TRUE(std::isnan(model.lowerLimit));
}

TEST(GammaModelTest, CubeRootsGiveTheLimitsAndTheFitGivesTheEstimates) {
    const std::vector<double> sample = {1.0, 8.0, 27.0, 64.0, 125.0};
    GammaModelTI model(sample.data(), 5, 0.05, 0.95, kel_TwoSided);
    EXPECT_DOUBLE_EQ(model.rawStandardDeviation, std::sqrt(2597.5));
    EXPECT_EQ(model.executeToleranceInterval(kel_TwoSided, 0.95, 0.9), QDR_FIT_OK);
    EXPECT_FALSE(model.logTransformed);

    // Transformed scale: cube roots 1..5 up to rounding.
    const double k = normalTwoSidedKFactor(5, 1.0 - 0.95, 0.9);
    EXPECT_EQ(model.lowerKFactor, k);
    EXPECT_NEAR(model.lowerLimit, std::pow(3.0 - k * std::sqrt(2.5), 3.0), 1e-12);
    EXPECT_NEAR(model.upperLimit, std::pow(3.0 + k * std::sqrt(2.5), 3.0), 1e-10);
    EXPECT_LT(model.lowerLimit, 0.0);  // K sqrt(2.5) > 3: the cube keeps the sign

    double shape = 0.0;
    double scale = 0.0;
    fitGammaIndependently(sample, shape, scale);
    EXPECT_NEAR(model.location, shape, 1e-8 * shape);
    EXPECT_NEAR(model.scale, scale, 1e-8 * scale);
    EXPECT_EQ(model.location, model.fittedParameters[1]);
    EXPECT_EQ(model.scale, model.fittedParameters[0]);
}

TEST(GammaModelTest, OneSidedBoundsOnALargerSample) {
    const std::vector<double> sample = {3.1, 4.7, 2.2, 8.9, 5.5, 6.1, 3.9, 4.4, 7.2, 2.8, 5.0, 4.1};
    GammaModelTI model(sample.data(), 12, 0.05, 0.95, kel_TwoSided);
    EXPECT_EQ(model.executeToleranceInterval(kel_UpperBound, 0.95, 0.9), 0);
    std::vector<double> roots;
    for (double x : sample) roots.push_back(std::cbrt(x));
    double mean = 0.0;
    double variance = 0.0;
    qdr_GetSampleMeanAndVariance(roots.data(), 12, &mean, &variance);
    const double k = normalOneSidedKFactor(12, 1.0 - 0.95, 0.9);
    EXPECT_NEAR(model.upperLimit, std::pow(mean + k * std::sqrt(variance), 3.0), 1e-12);
    EXPECT_EQ(model.lowerLimit, model.upperLimit);
    EXPECT_TRUE(isQuietNaN(model.lowerKFactor));
}

TEST(GammaModelTest, AllEqualObservationsReportNoEstimates) {
    const double sample[] = {4.0, 4.0, 4.0, 4.0};
    GammaModelTI model(sample, 4, 0.05, 0.95, kel_TwoSided);
    EXPECT_EQ(model.executeToleranceInterval(kel_TwoSided, 0.95, 0.9), QDR_FIT_ALL_EQUAL);
    EXPECT_TRUE(isQuietNaN(model.location));
    EXPECT_TRUE(isQuietNaN(model.scale));
    EXPECT_NEAR(model.lowerLimit, 4.0, 1e-13);
    EXPECT_NEAR(model.upperLimit, 4.0, 1e-13);
}

TEST(GammaModelTest, ANegativeObservationSpoilsTheLimits) {
    const double sample[] = {1.0, 2.0, -3.0, 4.0};
    GammaModelTI model(sample, 4, 0.05, 0.95, kel_TwoSided);
    EXPECT_EQ(model.executeToleranceInterval(kel_TwoSided, 0.95, 0.9), QDR_FIT_BAD_VALUE);
    EXPECT_TRUE(std::isnan(model.data[2]));
    EXPECT_TRUE(std::isnan(model.lowerLimit));
    EXPECT_TRUE(std::isnan(model.upperLimit));
    EXPECT_TRUE(std::isnan(model.location));  // the failed fit's NaN is reported
}

TEST(GammaModelTest, EmptySampleIsHandled) {
    GammaModelTI model(nullptr, 0, 0.05, 0.95, kel_TwoSided);
    EXPECT_EQ(model.executeToleranceInterval(kel_TwoSided, 0.95, 0.9), QDR_FIT_TOO_FEW);
    EXPECT_TRUE(isQuietNaN(model.lowerLimit));
    EXPECT_TRUE(std::isnan(model.location));
}

}  // namespace
}  // namespace kelstat
