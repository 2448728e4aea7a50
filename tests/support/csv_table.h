// Reads the reference CSVs of tests/data: '#' lines are provenance comments, the first other line
// names the columns, every further line is split at commas into fields.
#ifndef KELSTAT_TESTS_SUPPORT_CSV_TABLE_H
#define KELSTAT_TESTS_SUPPORT_CSV_TABLE_H

#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace kelstat_test {

// Rows of fields from tests/data/<name>; empty when the file cannot be read.
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

}  // namespace kelstat_test

#endif
