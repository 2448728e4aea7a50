// Helpers shared by the tolerance-interval tests: reading reference tables and comparing bits.
#ifndef KELSTAT_TESTS_TOLERANCE_SUPPORT_H
#define KELSTAT_TESTS_TOLERANCE_SUPPORT_H

#include <cmath>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "csv_table.h"

namespace kelstat::testing {

using kelstat_test::readCsv;

inline uint64_t bitsOf(double value) {
    uint64_t bits = 0;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

// The library's "not computed": the quiet NaN 0x7FF8000000000000 exactly.
inline bool isQuietNaN(double value) {
    return bitsOf(value) == 0x7FF8000000000000ull;
}

inline double relativeError(double value, double reference) {
    return std::fabs(value - reference) / std::fabs(reference);
}

}  // namespace kelstat::testing

#endif  // KELSTAT_TESTS_TOLERANCE_SUPPORT_H
