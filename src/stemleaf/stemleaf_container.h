// Building the content of a stem-and-leaf display: lines, leaves, depths and outliers.
#ifndef KELSTAT_STEMLEAF_STEMLEAF_CONTAINER_H
#define KELSTAT_STEMLEAF_STEMLEAF_CONTAINER_H

#include <cstdint>

#include "kelstat.h"
#include "stemleaf/stemleaf_scale.h"

namespace kelstat {

// A display with more lines than this cannot be read, and its line records alone could exhaust
// the host's memory.
constexpr std::int64_t kMostDisplayLines = KEL_STEMLEAF_MAX_LINES;

// The leaf-unit quotients Q(column[i] / leafUnit) of a column, computed where they are needed
// rather than stored: each is used at most twice, and a stored copy would cost as much memory
// traffic as the leaves themselves.
struct LeafQuotients {
    const double* column;
    double leafUnit;

    std::int32_t operator[](std::int64_t i) const {
        return getIntegerEqualOrNextCloserToZero(column[i] / leafUnit);
    }
};

// Copies the quotients values[from..to] (inclusive) into a new array attached to the container
// as its high (isHigh) or low outliers. Does nothing when to < from.
void getOutliers(const LeafQuotients& values, std::int64_t from, std::int64_t to, bool isHigh,
                 kel_StemAndLeaf& container);

// The end of the run of values from position onwards (up to end, exclusive) that belong to the
// line whose upper edge in leaf units is upperEdge: quotients below the edge, or at it on the
// negative side of zero; on the -0 line (edge 0, negative side) also the values below zero whose
// quotient is 0. The column is ascending, so the values that belong come first; the search
// gallops, costing O(log(line length)) rather than a step per value.
std::int64_t findDepth(const LeafQuotients& values, std::int64_t position, std::int64_t end,
                       std::int64_t upperEdge, bool negativeSide);

// Fills every line's depth and the median line's index from the leaf and outlier counts.
void computeCountsToMedian(kel_StemAndLeaf& container);

// Builds the display of the column (n >= 1, below 2^31) at a validated scale into a container
// holding nothing. Returns 0; 300001 when the column is not ascending or holds NaN (nothing
// written) or the display would need more than kMostDisplayLines lines; 300002 when a value is
// kQuotientLimit leaf units or more from zero. After a failure the container holds at most the
// leaf unit. Temporaries are released on every path, exceptions included.
std::int32_t runStemAndLeaf(const double* column, std::uint32_t n,
                            const kel_StemAndLeafScaleInfo& scale, kel_StemAndLeaf& container);

// Releases every array hanging from the container and the container itself.
void releaseStemAndLeaf(kel_StemAndLeaf* container);

}  // namespace kelstat

#endif  // KELSTAT_STEMLEAF_STEMLEAF_CONTAINER_H
