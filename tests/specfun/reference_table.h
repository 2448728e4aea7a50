// Reads the reference CSVs of tests/data: '#' lines are provenance comments, the first other
// line names the columns, the rest are numbers.
#ifndef KELSTAT_TESTS_SPECFUN_REFERENCE_TABLE_H
#define KELSTAT_TESTS_SPECFUN_REFERENCE_TABLE_H

#include <cstdlib>
#include <iomanip>
#include <sstream>
#include <string>
#include <vector>

#include "csv_table.h"

namespace kelstat_test {

// Rows of numbers from tests/data/<name>; empty when the file cannot be read.
inline std::vector<std::vector<double>> readReferenceTable(const std::string& name) {
    std::vector<std::vector<double>> rows;
    for (const std::vector<std::string>& fields : readCsv(name)) {
        std::vector<double> row;
        for (const std::string& field : fields) row.push_back(std::strtod(field.c_str(), nullptr));
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
