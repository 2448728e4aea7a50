// Fuzz target for the stem-and-leaf family: any column (sorted or not, any doubles), any scale
// record, through find-scale, create, run, reading every line, a refused second run, and delete.
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "fuzz_input.h"
#include "kelstat.h"
#include "stemleaf/stemleaf_scale.h"

namespace {

using kelstat_fuzz::FuzzInput;

// Columns long enough for galloping searches and blocked passes, short enough to stay fast.
constexpr std::size_t kLongestColumn = 5000;

bool isAscendingWithoutNaN(const std::vector<double>& column) {
    for (std::size_t i = 0; i < column.size(); ++i) {
        if (std::isnan(column[i])) return false;
        if (i > 0 && column[i - 1] > column[i]) return false;
    }
    return true;
}

bool holdsNothing(const kel_StemAndLeaf& container) {
    return container.lineCount == 0 && container.lines == nullptr &&
           container.lowOutlierCount == 0 && container.lowOutliers == nullptr &&
           container.highOutlierCount == 0 && container.highOutliers == nullptr &&
           container.medianLine == -1 && container.isComplete == 0;
}

// The check walks every line of displays up to millions of lines long; comparison tracing there
// would cost more than the run it checks and guide the fuzzer nowhere, so it is left out.
#if defined(__clang__)
#define KELSTAT_FUZZ_UNTRACED __attribute__((no_sanitize("coverage")))
#else
#define KELSTAT_FUZZ_UNTRACED
#endif

// Every value appears exactly once, in column order: the low outliers, the leaves line by line,
// the high outliers, each as its leaf-unit quotient. Lines ascend, leaves are digits, depths and
// the median line are consistent with the counts.
KELSTAT_FUZZ_UNTRACED void checkDisplay(const std::vector<double>& column,
                                        const kel_StemAndLeaf& display) {
    KELSTAT_FUZZ_CHECK(display.isComplete == 1);
    KELSTAT_FUZZ_CHECK(display.lineCount >= 1);
    KELSTAT_FUZZ_CHECK(display.lineCount <= KEL_STEMLEAF_MAX_LINES);
    KELSTAT_FUZZ_CHECK(display.lines != nullptr);
    KELSTAT_FUZZ_CHECK(display.lowOutlierCount >= 0 && display.highOutlierCount >= 0);
    KELSTAT_FUZZ_CHECK((display.lowOutlierCount == 0) == (display.lowOutliers == nullptr));
    KELSTAT_FUZZ_CHECK((display.highOutlierCount == 0) == (display.highOutliers == nullptr));
    KELSTAT_FUZZ_CHECK(display.medianLine >= -1 &&
                       display.medianLine < static_cast<std::int64_t>(display.lineCount));

    std::vector<std::int64_t> found;
    found.reserve(column.size());
    for (std::int32_t i = 0; i < display.lowOutlierCount; ++i) {
        found.push_back(display.lowOutliers[i]);
    }
    std::int64_t total = std::int64_t{display.lowOutlierCount} + display.highOutlierCount;
    for (std::uint32_t i = 0; i < display.lineCount; ++i) {
        const kel_StemAndLeafLine& line = display.lines[i];
        KELSTAT_FUZZ_CHECK(line.leafCount >= 0);
        KELSTAT_FUZZ_CHECK((line.leafCount == 0) == (line.leaves == nullptr));
        KELSTAT_FUZZ_CHECK(line.isPositive == 0 || line.isPositive == 1);
        KELSTAT_FUZZ_CHECK(line.isPositive == 1 || line.stem <= 0);
        KELSTAT_FUZZ_CHECK(line.depth >= 0);
        total += line.leafCount;
        KELSTAT_FUZZ_CHECK(total <= static_cast<std::int64_t>(column.size()));
        const std::int64_t base = std::int64_t{line.stem} * 10;
        for (std::int32_t j = 0; j < line.leafCount; ++j) {
            const std::int32_t leaf = line.leaves[j];
            KELSTAT_FUZZ_CHECK(leaf >= 0 && leaf <= 9);
            found.push_back(line.isPositive ? base + leaf : base - leaf);
        }
        if (i > 0) {
            const kel_StemAndLeafLine& before = display.lines[i - 1];
            const bool ascends = before.isPositive < line.isPositive ||
                                 (before.isPositive == line.isPositive && before.stem <= line.stem);
            KELSTAT_FUZZ_CHECK(ascends);
        }
    }
    for (std::int32_t i = 0; i < display.highOutlierCount; ++i) {
        found.push_back(display.highOutliers[i]);
    }
    KELSTAT_FUZZ_CHECK(total == static_cast<std::int64_t>(column.size()));
    KELSTAT_FUZZ_CHECK(found.size() == column.size());
    for (std::size_t i = 0; i < column.size(); ++i) {
        const std::int64_t expected =
            kelstat::getIntegerEqualOrNextCloserToZero(column[i] / display.leafUnit);
        KELSTAT_FUZZ_CHECK(found[i] == expected);
    }
    if (display.medianLine >= 0) {
        const kel_StemAndLeafLine& median = display.lines[display.medianLine];
        KELSTAT_FUZZ_CHECK(median.depth == median.leafCount);
    }
}

// After a refused run the container holds at most the leaf unit.
bool holdsAtMostLeafUnit(const kel_StemAndLeaf& container, double leafUnit) {
    kel_StemAndLeaf rest = container;
    rest.leafUnit = 0.0;
    return holdsNothing(rest) && (container.leafUnit == 0.0 || container.leafUnit == leafUnit);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
    FuzzInput input(bytes, size);
    const std::uint8_t flags = input.byte();
    const bool sortColumn = (flags & 1) != 0;
    const bool tamperScale = (flags & 2) != 0;
    const bool passNullColumn = (flags & 0x1C) == 0x1C;

    kel_StemAndLeafScaleInfo scale;
    std::memset(&scale, 0xA5, sizeof scale);
    scale.increment = (flags & 0x20) ? input.value() : 0.0;
    scale.trimOutliers = (flags & 0x40) ? input.byte() | 1 : 0;

    std::vector<double> column;
    kelstat_fuzz::fillColumn(input, input.u16() % (kLongestColumn + 1), column);
    if (sortColumn) {
        // NaN last, so the comparison is a strict weak order.
        std::sort(column.begin(), column.end(), [](double a, double b) {
            return std::isnan(a) ? false : (std::isnan(b) ? true : a < b);
        });
    }
    const std::vector<double> original = column;
    const double* data = passNullColumn || column.empty() ? nullptr : column.data();
    const auto n = static_cast<std::uint32_t>(passNullColumn ? input.byte() : column.size());
    const bool usable = data != nullptr && n > 0 && isAscendingWithoutNaN(column);

    const kel_StemAndLeafScaleInfo before = scale;
    const std::int32_t found = kel_FindStemAndLeafScaleInfo(data, n, &scale);
    if (!usable) {
        KELSTAT_FUZZ_CHECK(found == KEL_STEMLEAF_INVALID_INPUT);
        KELSTAT_FUZZ_CHECK(std::memcmp(&before, &scale, sizeof scale) == 0);
    } else {
        KELSTAT_FUZZ_CHECK(found == KEL_OK);
        const double perLine = scale.leavesPerLine;
        KELSTAT_FUZZ_CHECK(perLine == 1.0 || perLine == 2.0 || perLine == 5.0 || perLine == 10.0);
        KELSTAT_FUZZ_CHECK(scale.trimOutliers == before.trimOutliers);
    }
    KELSTAT_FUZZ_CHECK(kel_FindStemAndLeafScaleInfo(data, n, nullptr) ==
                       KEL_STEMLEAF_INVALID_INPUT);

    if (tamperScale) {
        switch (input.byte() % 4) {
            case 0:
                scale.leafUnit = input.value();
                break;
            case 1:
                scale.leavesPerLine = input.value();
                break;
            case 2:
                scale.increment = input.value();
                break;
            default:
                scale.trimOutliers = input.byte();
                break;
        }
    }

    kel_StemAndLeaf* container = kel_CreateStemAndLeafContainer();
    KELSTAT_FUZZ_CHECK(container != nullptr && holdsNothing(*container));
    KELSTAT_FUZZ_CHECK(kel_RunStemAndLeaf(data, n, &scale, nullptr) == KEL_STEMLEAF_INVALID_INPUT);
    KELSTAT_FUZZ_CHECK(kel_RunStemAndLeaf(data, n, nullptr, container) ==
                       KEL_STEMLEAF_INVALID_INPUT);
    const std::int32_t ran = kel_RunStemAndLeaf(data, n, &scale, container);
    const double perLine = scale.leavesPerLine;
    const bool scaleUsable =
        std::isfinite(scale.leafUnit) && scale.leafUnit > 0.0 &&
        (perLine == 1.0 || perLine == 2.0 || perLine == 5.0 || perLine == 10.0);
    if (!usable || !scaleUsable) {
        KELSTAT_FUZZ_CHECK(ran == KEL_STEMLEAF_INVALID_INPUT);
        KELSTAT_FUZZ_CHECK(holdsNothing(*container) && container->leafUnit == 0.0);
    } else if (ran == KEL_OK) {
        checkDisplay(column, *container);
        // A container serves one run: a second is refused and leaves the display as it was.
        const kel_StemAndLeaf held = *container;
        KELSTAT_FUZZ_CHECK(kel_RunStemAndLeaf(data, n, &scale, container) ==
                           KEL_STEMLEAF_INVALID_INPUT);
        KELSTAT_FUZZ_CHECK(std::memcmp(&held, container, sizeof held) == 0);
    } else {
        KELSTAT_FUZZ_CHECK(ran == KEL_STEMLEAF_VALUE_TOO_LARGE ||
                           ran == KEL_STEMLEAF_INVALID_INPUT);
        KELSTAT_FUZZ_CHECK(holdsAtMostLeafUnit(*container, scale.leafUnit));
    }
    KELSTAT_FUZZ_CHECK(column.empty() || std::memcmp(column.data(), original.data(),
                                                     column.size() * sizeof(double)) == 0);

    kel_DeleteStemAndLeafContainer(&container);
    KELSTAT_FUZZ_CHECK(container == nullptr);
    kel_DeleteStemAndLeafContainer(&container);
    kel_DeleteStemAndLeafContainer(nullptr);
    return 0;
}
