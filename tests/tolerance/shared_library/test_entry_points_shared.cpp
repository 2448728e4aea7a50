// The reference tables once more, through libkelstat.so and nothing but the public header: a
// K-factor is read from the record of a sample of the right size, an order-statistic index from
// a sample whose values are their own ranks.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <string>
#include <vector>

#include "kelstat.h"
#include "tolerance_test_support.h"

namespace {

using kelstat::testing::bitsOf;
using kelstat::testing::isQuietNaN;
using kelstat::testing::readCsv;
using kelstat::testing::relativeError;

std::vector<double> ranks(size_t n) {
    std::vector<double> values(n);
    for (size_t i = 0; i < n; ++i) values[i] = static_cast<double>(i + 1);
    return values;
}

TEST(SharedLibraryTest, NormalKFactorsThroughTheRecord) {
    const auto rows = readCsv("tolerance_normal_kfactors.csv");
    ASSERT_EQ(rows.size(), 135u);
    for (const auto& row : rows) {
        const std::vector<double> sample = ranks(std::stoul(row[0]));
        for (kel_ConfidenceType type : {kel_LowerBound, kel_TwoSided, kel_UpperBound}) {
            kel_ParametricTIData record{};
            record.distribution = KEL_DIST_NORMAL;
            record.confidenceType = type;
            record.confidenceLevel = std::stod(row[1]);
            record.proportion = std::stod(row[2]);
            ASSERT_EQ(kel_CalcParametricToleranceInterval(
                          sample.data(), static_cast<uint32_t>(sample.size()), &record),
                      0);
            const double k = type == kel_UpperBound ? record.upperKFactor : record.lowerKFactor;
            const double reference = std::stod(row[type == kel_TwoSided ? 4 : 3]);
            EXPECT_LE(relativeError(k, reference), type == kel_TwoSided ? 1e-11 : 1e-12)
                << row[0] << " " << row[1] << " " << row[2] << " type " << type;
        }
    }
}

TEST(SharedLibraryTest, NonParametricLimitsThroughTheRecord) {
    const auto rows = readCsv("tolerance_nonparametric.csv");
    ASSERT_EQ(rows.size(), 6u * 499u * 3u);
    int failures = 0;
    for (const auto& row : rows) {
        const std::vector<double> sample = ranks(std::stoul(row[3]));
        kel_NonParametricTIData record{};
        record.confidenceType = std::stoi(row[0]);
        record.confidenceLevel = std::stod(row[1]);
        record.proportion = std::stod(row[2]);
        ASSERT_EQ(kel_CalcNonParametricToleranceInterval(
                      sample.data(), static_cast<uint32_t>(sample.size()), &record),
                  0);
        const bool match = record.lowerLimit == std::stod(row[4]) &&
                           record.upperLimit == std::stod(row[5]) &&
                           std::fabs(record.achievedConfidence - std::stod(row[6])) <= 1e-10;
        if (!match && ++failures <= 10) {
            ADD_FAILURE() << "type " << row[0] << " " << row[1] << "/" << row[2] << " n " << row[3]
                          << ": " << record.lowerLimit << " " << record.upperLimit << " "
                          << record.achievedConfidence;
        }
    }
    EXPECT_EQ(failures, 0);
}

TEST(SharedLibraryTest, EdgeRules) {
    const std::vector<double> sample = {4.2, 5.1, 3.8, 6.0, 5.5, 4.9, 5.2, 4.4, 6.3, 5.0};
    kel_ParametricTIData normal{};
    normal.confidenceType = kel_TwoSided;
    normal.confidenceLevel = 0.95;
    normal.proportion = 0.9;
    EXPECT_EQ(kel_CalcParametricToleranceInterval(sample.data(), 10, &normal), 0);
    for (uint32_t code : {9u, 0xFFFFFFFFu}) {
        kel_ParametricTIData other = normal;
        other.distribution = code;
        other.lowerLimit = other.upperLimit = 0.0;
        EXPECT_EQ(kel_CalcParametricToleranceInterval(sample.data(), 10, &other), 0);
        EXPECT_EQ(bitsOf(other.lowerLimit), bitsOf(normal.lowerLimit)) << code;
        EXPECT_EQ(bitsOf(other.upperLimit), bitsOf(normal.upperLimit)) << code;
    }
    for (uint32_t count : {0u, 1u}) {
        kel_ParametricTIData tiny = normal;
        EXPECT_EQ(kel_CalcParametricToleranceInterval(sample.data(), count, &tiny), 0);
        EXPECT_TRUE(isQuietNaN(tiny.lowerKFactor));
        EXPECT_TRUE(isQuietNaN(tiny.lowerLimit));
        EXPECT_TRUE(isQuietNaN(tiny.auxiliary[0]));
    }
    kel_ParametricTIData wrongType = normal;
    wrongType.confidenceType = 2;
    EXPECT_EQ(kel_CalcParametricToleranceInterval(sample.data(), 10, &wrongType), 0);
    EXPECT_EQ(wrongType.location, normal.location);
    EXPECT_TRUE(isQuietNaN(wrongType.lowerLimit));
    EXPECT_TRUE(isQuietNaN(wrongType.upperKFactor));

    EXPECT_EQ(kel_CalcParametricToleranceInterval(sample.data(), 10, nullptr), 0);
    EXPECT_EQ(kel_CalcNonParametricToleranceInterval(sample.data(), 10, nullptr), 0);
    kel_ParametricTIData nullData = normal;
    EXPECT_EQ(kel_CalcParametricToleranceInterval(nullptr, 100, &nullData), 0);
    EXPECT_TRUE(isQuietNaN(nullData.location));

    unsigned char bytes[sizeof(kel_NonParametricTIData)];
    std::memset(bytes, 0x3C, sizeof bytes);
    kel_NonParametricTIData record;
    std::memcpy(&record, bytes, sizeof record);
    record.confidenceType = kel_TwoSided;
    record.confidenceLevel = 0.95;
    record.proportion = 0.9;
    EXPECT_EQ(kel_CalcNonParametricToleranceInterval(nullptr, 100, &record), 0);
    std::memcpy(bytes, &record, sizeof record);
    for (size_t offset = 4; offset < 8; ++offset) EXPECT_EQ(bytes[offset], 0x3C);
    EXPECT_TRUE(isQuietNaN(record.lowerLimit));
    EXPECT_TRUE(isQuietNaN(record.achievedConfidence));
}

}  // namespace
