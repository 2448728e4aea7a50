#include "stemleaf/stemleaf_container.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <memory>

#include "kelstat.h"
#include "stemleaf/stemleaf_scale.h"

namespace kelstat {

namespace {

// The quotient pass checks the order of a block of the column just before dividing it, so the
// column is read from memory once; each block fits in the first-level cache.
constexpr std::uint32_t kQuotientBlock = 1024;

void releaseArrays(kel_StemAndLeaf& container) {
    if (container.lines != nullptr) {
        for (std::uint32_t i = 0; i < container.lineCount; ++i) delete[] container.lines[i].leaves;
        delete[] container.lines;
    }
    delete[] container.lowOutliers;
    delete[] container.highOutliers;
    container.lines = nullptr;
    container.lowOutliers = nullptr;
    container.highOutliers = nullptr;
}

// A display being built. Everything is assembled here and moved into the caller's container
// only once the run has succeeded, so that a failure (or an allocation that throws) leaves the
// caller's container as it was and leaks nothing.
class DisplayUnderConstruction {
  public:
    DisplayUnderConstruction() : display_{} { display_.medianLine = -1; }
    ~DisplayUnderConstruction() { releaseArrays(display_); }
    DisplayUnderConstruction(const DisplayUnderConstruction&) = delete;
    DisplayUnderConstruction& operator=(const DisplayUnderConstruction&) = delete;

    kel_StemAndLeaf& display() { return display_; }

    void handOverTo(kel_StemAndLeaf& target) {
        target = display_;
        display_ = kel_StemAndLeaf{};
    }

  private:
    kel_StemAndLeaf display_;
};

// Leaf-unit quotients of the whole column. False, with the quotients incomplete, when the column
// is out of order or holds NaN.
bool computeQuotients(const double* column, std::uint32_t n, double leafUnit,
                      std::int32_t* quotients) {
    if (std::isnan(column[0])) return false;
    for (std::uint32_t start = 0; start < n; start += kQuotientBlock) {
        const std::uint32_t end = n - start > kQuotientBlock ? start + kQuotientBlock : n;
        unsigned outOfOrder = 0;
        for (std::uint32_t i = std::max(start, 1u); i < end; ++i) {
            outOfOrder |= !(column[i - 1] <= column[i]);
        }
        if (outOfOrder != 0) return false;
        for (std::uint32_t i = start; i < end; ++i) {
            quotients[i] = getIntegerEqualOrNextCloserToZero(column[i] / leafUnit);
        }
    }
    return true;
}

bool allMultiplesOfTen(const std::int32_t* quotients, std::int64_t from, std::int64_t to) {
    for (std::int64_t i = from; i <= to; ++i) {
        if (quotients[i] % 10 != 0) return false;
    }
    return true;
}

}  // namespace

void getOutliers(const std::int32_t* values, std::int64_t from, std::int64_t to, bool isHigh,
                 kel_StemAndLeaf& container) {
    if (to < from) return;
    const std::int64_t count = to - from + 1;
    auto* copy = new std::int32_t[static_cast<std::size_t>(count)];
    std::copy(values + from, values + to + 1, copy);
    if (isHigh) {
        container.highOutliers = copy;
        container.highOutlierCount = static_cast<std::int32_t>(count);
    } else {
        container.lowOutliers = copy;
        container.lowOutlierCount = static_cast<std::int32_t>(count);
    }
}

std::int64_t findDepth(const std::int32_t* quotients, const double* column, std::int64_t position,
                       std::int64_t end, std::int64_t upperEdge, bool negativeSide) {
    const bool takesEdge = upperEdge < 0;
    const bool isNegativeZeroLine = upperEdge == 0 && negativeSide;
    const auto belongs = [&](std::int64_t i) {
        const std::int64_t quotient = quotients[i];
        if (quotient < upperEdge) return true;
        if (quotient != upperEdge) return false;
        return takesEdge || (isNegativeZeroLine && column[i] < 0.0);
    };

    if (position >= end || !belongs(position)) return position;
    // Gallop to a value that does not belong (or the end), then bisect: taken stays a member,
    // refused a non-member or the end.
    std::int64_t taken = position;
    std::int64_t refused = end;
    for (std::int64_t stride = 1;; stride *= 2) {
        const std::int64_t probe = taken + stride;
        if (probe >= end) break;
        if (!belongs(probe)) {
            refused = probe;
            break;
        }
        taken = probe;
    }
    while (refused - taken > 1) {
        const std::int64_t middle = taken + (refused - taken) / 2;
        if (belongs(middle)) {
            taken = middle;
        } else {
            refused = middle;
        }
    }
    return refused;
}

void computeCountsToMedian(kel_StemAndLeaf& container) {
    const std::int64_t lineCount = container.lineCount;
    kel_StemAndLeafLine* lines = container.lines;
    std::int64_t total = std::int64_t{container.lowOutlierCount} + container.highOutlierCount;
    for (std::int64_t i = 0; i < lineCount; ++i) total += lines[i].leafCount;
    const double half = static_cast<double>(total) / 2.0;

    // From the low end up to the line where the running count reaches half the values.
    std::int64_t lastUpward = -1;
    if (half > container.lowOutlierCount && lineCount > 0) {
        std::int64_t running = container.lowOutlierCount;
        for (std::int64_t i = 0; i < lineCount; ++i) {
            running += lines[i].leafCount;
            if (running > half) {
                container.medianLine = static_cast<std::int32_t>(i);
                lines[i].depth = lines[i].leafCount;
            } else {
                lines[i].depth = static_cast<std::int32_t>(running);
            }
            lastUpward = i;
            if (!(running < half)) break;
        }
    }

    // From the high end down to the lines the upward pass did not reach.
    if (half >= container.highOutlierCount) {
        std::int64_t running = container.highOutlierCount;
        for (std::int64_t i = lineCount - 1; i > lastUpward; --i) {
            running += lines[i].leafCount;
            if (running > half) break;
            lines[i].depth = static_cast<std::int32_t>(running);
        }
    }
}

std::int32_t runStemAndLeaf(const double* column, std::uint32_t n,
                            const kel_StemAndLeafScaleInfo& scale, kel_StemAndLeaf& container) {
    const double leafUnit = scale.leafUnit;

    std::int64_t lowIndex = 0;
    std::int64_t highIndex = std::int64_t{n} - 1;
    if (n >= 3 && scale.trimOutliers != 0) {
        StemAndLeafHingeInfo hinges;
        getHingeInfo(column, n, hinges);
        lowIndex = hinges.lowAdjacentIndex;
        highIndex = hinges.highAdjacentIndex;
    }
    const double low = column[lowIndex];
    const double high = column[highIndex];

    std::unique_ptr<std::int32_t[]> quotients(new std::int32_t[n]);
    if (!computeQuotients(column, n, leafUnit, quotients.get())) return KEL_STEMLEAF_INVALID_INPUT;
    // The quotients ascend with the column, so a saturated one sits at an end.
    const auto saturated = [](std::int32_t q) {
        return q == kQuotientLimit || q == -kQuotientLimit;
    };
    if (saturated(quotients[0]) || saturated(quotients[n - 1])) {
        container.leafUnit = leafUnit;
        return KEL_STEMLEAF_VALUE_TOO_LARGE;
    }

    // Line width in leaf units. When every retained leaf would be 0 one line per stem says all.
    double width = scale.leavesPerLine;
    if (scale.leavesPerLine == 10.0) {
        width = 10.0;
    } else if (!(scale.increment > 0.0) &&
               allMultiplesOfTen(quotients.get(), lowIndex, highIndex)) {
        width = 10.0;
    }
    const double lineSpan = leafUnit * width;
    const std::int64_t step = getIntegerEqualOrNextCloserToZero(width);

    const std::int64_t zeroLine = high == 0.0 || low * high < 0.0 ? 1 : 0;
    const std::int64_t lineCount =
        std::int64_t{getIntegerEqualOrNextCloserToZero(high / lineSpan)} -
        getIntegerEqualOrNextCloserToZero(low / lineSpan) + 1 + zeroLine;
    if (lineCount > kMostDisplayLines) {
        container.leafUnit = leafUnit;
        return KEL_STEMLEAF_INVALID_INPUT;
    }

    DisplayUnderConstruction building;
    kel_StemAndLeaf& display = building.display();
    display.leafUnit = leafUnit;
    getOutliers(quotients.get(), 0, lowIndex - 1, false, display);

    display.lines = new kel_StemAndLeafLine[static_cast<std::size_t>(lineCount)]();
    display.lineCount = static_cast<std::uint32_t>(lineCount);

    // The starting edge: the fuzz factor pushes an exact negative multiple of the step one step
    // down, so that the first line is the one whose range ends at that value.
    const std::int32_t first = quotients[lowIndex];
    std::int64_t upperEdge = static_cast<std::int64_t>(
        std::floor(first * kQuotientFuzz / static_cast<double>(step)) * static_cast<double>(step));
    std::int64_t base = first > 0 ? upperEdge - step : upperEdge;
    bool negativeSide = first <= 0;

    std::int64_t position = lowIndex;
    const std::int64_t retainedEnd = highIndex + 1;
    for (std::int64_t i = 0; i < lineCount; ++i) {
        upperEdge += step;
        if (negativeSide && base == 0) {
            negativeSide = false;  // from the -0 line to the +0 line
        } else {
            base += step;
        }
        const std::int64_t next =
            findDepth(quotients.get(), column, position, retainedEnd, upperEdge, negativeSide);

        kel_StemAndLeafLine& line = display.lines[i];
        const std::int64_t stem = base / 10;
        line.stem = static_cast<std::int32_t>(stem);
        line.isPositive = negativeSide ? 0 : 1;
        line.leafCount = static_cast<std::int32_t>(next - position);
        if (next > position) {
            auto* leaves = new std::int32_t[static_cast<std::size_t>(next - position)];
            line.leaves = leaves;
            const auto stemInLeafUnits = static_cast<std::int32_t>(stem * 10);
            const std::int32_t* source = quotients.get() + position;
            for (std::int64_t j = 0; j < next - position; ++j) {
                leaves[j] = std::abs(source[j] - stemInLeafUnits);
            }
        }
        position = next;
    }
    getOutliers(quotients.get(), position, std::int64_t{n} - 1, true, display);

    display.isComplete = 1;
    computeCountsToMedian(display);
    building.handOverTo(container);
    return KEL_OK;
}

void releaseStemAndLeaf(kel_StemAndLeaf* container) {
    if (container == nullptr) return;
    releaseArrays(*container);
    delete container;
}

}  // namespace kelstat
