// Shared by the stem-and-leaf tests: a display copied out of a container into plain values, so
// that whole displays compare with == and print readably on failure.
#ifndef KELSTAT_TESTS_STEMLEAF_TEST_SUPPORT_H
#define KELSTAT_TESTS_STEMLEAF_TEST_SUPPORT_H

#include <cstdint>
#include <ostream>
#include <vector>

#include "kelstat.h"

namespace kelstat::testing {

struct Line {
    std::int32_t depth;
    std::int32_t stem;
    bool isPositive;
    std::vector<std::int32_t> leaves;

    bool operator==(const Line& other) const {
        return depth == other.depth && stem == other.stem && isPositive == other.isPositive &&
               leaves == other.leaves;
    }
};

struct Display {
    std::vector<Line> lines;
    std::vector<std::int32_t> lowOutliers;
    std::vector<std::int32_t> highOutliers;
    double leafUnit = 0;
    std::int32_t medianLine = -1;

    bool operator==(const Display& other) const {
        return lines == other.lines && lowOutliers == other.lowOutliers &&
               highOutliers == other.highOutliers && leafUnit == other.leafUnit &&
               medianLine == other.medianLine;
    }
};

inline Display copyDisplay(const kel_StemAndLeaf& container) {
    Display display;
    for (std::uint32_t i = 0; i < container.lineCount; ++i) {
        const kel_StemAndLeafLine& line = container.lines[i];
        Line copy{line.depth, line.stem, line.isPositive != 0, {}};
        if (line.leafCount > 0) copy.leaves.assign(line.leaves, line.leaves + line.leafCount);
        display.lines.push_back(copy);
    }
    if (container.lowOutlierCount > 0) {
        display.lowOutliers.assign(container.lowOutliers,
                                   container.lowOutliers + container.lowOutlierCount);
    }
    if (container.highOutlierCount > 0) {
        display.highOutliers.assign(container.highOutliers,
                                    container.highOutliers + container.highOutlierCount);
    }
    display.leafUnit = container.leafUnit;
    display.medianLine = container.medianLine;
    return display;
}

inline std::ostream& operator<<(std::ostream& out, const Display& display) {
    out << "leaf unit " << display.leafUnit << ", median line " << display.medianLine << "\n";
    out << "LO:";
    for (std::int32_t value : display.lowOutliers) out << ' ' << value;
    out << "\n";
    for (const Line& line : display.lines) {
        out << line.depth << "  " << (line.stem == 0 && !line.isPositive ? "-" : "") << line.stem
            << " |";
        for (std::int32_t leaf : line.leaves) out << ' ' << leaf;
        out << "\n";
    }
    out << "HI:";
    for (std::int32_t value : display.highOutliers) out << ' ' << value;
    return out << "\n";
}

}  // namespace kelstat::testing

#endif  // KELSTAT_TESTS_STEMLEAF_TEST_SUPPORT_H
