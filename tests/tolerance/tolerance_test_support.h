// Helpers shared by the tolerance-interval tests: reading reference tables and comparing bits.
#ifndef KELSTAT_TESTS_TOLERANCE_SUPPORT_H
#define KELSTAT_TESTS_TOLERANCE_SUPPORT_H

#include <cmath>
#include <cstdint>
#include <cstring>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace kelstat::testing {

// Rows of a CSV under tests/data: comment lines (#) and the header line are skipped; every other
// line is split at commas into strings.
inline std::vector<std::vector<std::string>> readCsv(const std::string& name) {
    std::ifstream in(std::string(KELSTAT_TEST_DATA_DIR) + "/" + name);
    std::vector<std::vector<std::string>> rows;
    std::string line;
    bool headerSeen = false;
    while (std::getline(in, line)) {
        if (line.empty() || line[0] == '#') continue;
        if (!headerSeen) {
            headerSeen = true;
            continue;
        }
        std::vector<std::string> fields;
        std::stringstream stream(line);
        std::string field;
        while (std::getline(stream, field, ',')) fields.push_back(field);
        rows.push_back(fields);
    }
    return rows;
}

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
