// Fuzz target for the nonparametric tolerance interval: any confidence type, level and
// proportion, any data (sorted or not), up to a few thousand observations, and the null-pointer
// forms.
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "fuzz_input.h"
#include "kelstat.h"

namespace {

using kelstat_fuzz::FuzzInput;
using kelstat_fuzz::isUnwritten;
using kelstat_fuzz::sameBits;

constexpr std::size_t kLargestSample = 4000;
// The achieved confidence is a percentage made of probabilities computed to about 1e-13.
constexpr double kPercentSlack = 1e-9;

bool isOneOf(double x, const std::vector<double>& column) {
    return std::any_of(column.begin(), column.end(), [x](double y) { return sameBits(x, y); });
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
    FuzzInput input(bytes, size);
    const std::uint8_t flags = input.byte();

    kel_NonParametricTIData request;
    std::memset(&request, 0x5A, sizeof request);  // the gap at offset 4 must keep these bytes
    const std::uint8_t typeTag = input.byte();
    request.confidenceType = typeTag < 250 ? static_cast<kel_ConfidenceType>(typeTag % 3) - 1
                                           : static_cast<kel_ConfidenceType>(input.u32());
    request.confidenceLevel = input.level();
    request.proportion = input.level();
    const double unwritten = kelstat_fuzz::unwrittenValue();
    request.lowerLimit = request.upperLimit = request.achievedConfidence = unwritten;

    std::vector<double> column;
    const std::size_t wanted =
        (flags & 0x40) ? input.u16() % (kLargestSample + 1) : input.byte() % 40;
    kelstat_fuzz::fillColumn(input, wanted, column);
    if (flags & 1) {
        std::sort(column.begin(), column.end(), [](double a, double b) {
            return std::isnan(a) ? false : (std::isnan(b) ? true : a < b);
        });
    }
    const std::vector<double> original = column;
    const bool nullData = (flags & 0x0E) == 0x0E;
    const double* data = nullData || column.empty() ? nullptr : column.data();
    const auto count = static_cast<std::uint32_t>(nullData ? input.u16() : column.size());
    const std::uint32_t used = data == nullptr ? 0 : count;

    kel_NonParametricTIData result = request;
    const std::int32_t code = kel_CalcNonParametricToleranceInterval(data, count, &result);
    KELSTAT_FUZZ_CHECK(code == 0);
    // Inputs and the gap stay as they were; the three outputs are written.
    KELSTAT_FUZZ_CHECK(std::memcmp(&request, &result, 24) == 0);
    KELSTAT_FUZZ_CHECK(!isUnwritten(result.lowerLimit) && !isUnwritten(result.upperLimit) &&
                       !isUnwritten(result.achievedConfidence));
    if (used < 2) {
        KELSTAT_FUZZ_CHECK(std::isnan(result.lowerLimit) && std::isnan(result.upperLimit) &&
                           std::isnan(result.achievedConfidence));
    }
    // The limits are order statistics: elements of the column, or NaN.
    KELSTAT_FUZZ_CHECK(std::isnan(result.lowerLimit) || isOneOf(result.lowerLimit, column));
    KELSTAT_FUZZ_CHECK(std::isnan(result.upperLimit) || isOneOf(result.upperLimit, column));
    KELSTAT_FUZZ_CHECK(
        std::isnan(result.lowerLimit) == std::isnan(result.upperLimit) ||
        std::any_of(column.begin(), column.end(), [](double x) { return std::isnan(x); }));

    const double level = result.confidenceLevel;
    const double proportion = result.proportion;
    const bool ordinaryLevels = level > 0.0 && level < 1.0 && proportion > 0.0 && proportion < 1.0;
    if (ordinaryLevels && used >= 2) {
        KELSTAT_FUZZ_CHECK(!std::isnan(result.achievedConfidence));
        KELSTAT_FUZZ_CHECK(result.achievedConfidence >= -kPercentSlack &&
                           result.achievedConfidence <= 100.0 + kPercentSlack);
        const bool sorted =
            std::is_sorted(column.begin(), column.end()) &&
            std::none_of(column.begin(), column.end(), [](double x) { return std::isnan(x); });
        if (sorted && result.confidenceType == kel_TwoSided) {
            KELSTAT_FUZZ_CHECK(result.lowerLimit <= result.upperLimit);
        }
    }
    KELSTAT_FUZZ_CHECK(column.empty() || std::memcmp(column.data(), original.data(),
                                                     column.size() * sizeof(double)) == 0);
    KELSTAT_FUZZ_CHECK(kel_CalcNonParametricToleranceInterval(data, count, nullptr) == 0);
    return 0;
}
