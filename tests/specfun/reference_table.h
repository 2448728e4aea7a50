// Reads the reference CSVs of tests/data: '#' lines are provenance comments, the first other
// line names the columns, the rest are numbers.
#ifndef KELSTAT_TESTS_SPECFUN_REFERENCE_TABLE_H
#define KELSTAT_TESTS_SPECFUN_REFERENCE_TABLE_H

#include <cstdlib>
#include <fstream>
#include <iomanip>
#include <sstream>
#include <string>
#include <vector>

namespace kelstat_test {

// Rows of numbers from tests/data/<name>; empty when the file cannot be read.
inline std::vector<std::vector<double>> readReferenceTable(const std::string& name) {
    std::vector<std::vector<double>> rows;
    std::ifstream in(std::string(KELSTAT_TEST_DATA_DIR) + "/" + name);
    std::string line;
    bool headerSeen = false;
    while (std::getline(in, line)) {
        if (line.empty() || line[0] == '#') continue;
        if (!headerSeen) {
            headerSeen = true;
            continue;
        }
        std::vector<double> row;
        std::stringstream fields(line);
        std::string field;
        while (std::getline(fields, field, ',')) row.push_back(std::strtod(field.c_str(), nullptr));
        rows.push_back(row);
    }
    return rows;
}

// An error figure for test reports, e.g. "3.2e-15".
inline std::string scientific(double value) {
    std::ostringstream out;
    out << std::setprecision(2) << std::scientific << value;
    return out.str();
}

}  // namespace kelstat_test

#endif  // KELSTAT_TESTS_SPECFUN_REFERENCE_TABLE_H
