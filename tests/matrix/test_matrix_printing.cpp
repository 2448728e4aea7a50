// The text form of a vector of doubles.
#include <gtest/gtest.h>

#include <iomanip>
#include <sstream>
#include <string>
#include <vector>

#include "matrix/matrix_trace.h"

namespace {

using vek::matrix_library::operator<<;

template <class Format>
std::string printed(const std::vector<double>& values, Format format) {
    std::ostringstream out;
    format(out);
    out << values;
    return out.str();
}

TEST(MatrixPrinting, VectorOfDoubles) {
    const auto plain = [](std::ostream&) {};
    EXPECT_EQ(printed({}, plain), "[]");
    EXPECT_EQ(printed({1.0, 2.5, -3.0}, plain), "[1, 2.5, -3, ]");
    EXPECT_EQ(printed({0.1}, plain), "[0.1, ]");
    // The stream's own number format applies to every element.
    EXPECT_EQ(printed({1.0, 1.0 / 3.0},
                      [](std::ostream& out) { out << std::fixed << std::setprecision(2); }),
              "[1.00, 0.33, ]");
    // The operator returns the stream it was given, so writes chain.
    std::ostringstream out;
    out << std::vector<double>{4.0} << "|" << std::vector<double>{};
    EXPECT_EQ(out.str(), "[4, ]|[]");
}

}  // namespace
