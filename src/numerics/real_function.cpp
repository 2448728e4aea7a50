#include "numerics/real_function.h"

#include <cmath>

namespace kelstat {

namespace {

constexpr double kRelativeFuzz = 1e-12;         // relative part of every fuzzy comparison
constexpr double kDefaultAbsoluteFuzz = 1e-30;  // absolute part when the caller names no magnitude
constexpr double kFuzzPerMagnitude = 1e-14;     // absolute fuzz per unit of a caller's magnitude
constexpr double kIntegerArgumentSpacing =
    2.0;  // integer arguments closer than this are neighbours

// The larger magnitude of two values; std::fmax ignores a NaN operand, as every fuzzy comparison
// here requires.
double fuzzScale(double a, double b) {
    return std::fmax(std::fabs(a), std::fabs(b));
}

}  // namespace

ZRXRealFunction& ZRXRealFunction::operator=(const ZRXRealFunction& other) {
    if (this != &other) {
        mIntegerX = other.mIntegerX;
        mScaleForF = other.mScaleForF;
        mAbsoluteToleranceForX = other.mAbsoluteToleranceForX;
        mRelativeToleranceForX = other.mRelativeToleranceForX;
        mAbsoluteToleranceForF = other.mAbsoluteToleranceForF;
        mRelativeToleranceForF = other.mRelativeToleranceForF;
    }
    return *this;
}

double ZRXRealFunction::mGetAbsoluteToleranceForX() const {
    return mAbsoluteToleranceForX;
}
double ZRXRealFunction::mGetRelativeToleranceForX() const {
    return mRelativeToleranceForX;
}
double ZRXRealFunction::mGetAbsoluteToleranceForF() const {
    return mAbsoluteToleranceForF;
}
double ZRXRealFunction::mGetRelativeToleranceForF() const {
    return mRelativeToleranceForF;
}

bool ZRXRealFunction::mIsConvergedForX(double x1, double x2) const {
    const double distance = std::fabs(x1 - x2);
    if (mIntegerX) {
        if (distance < kIntegerArgumentSpacing) return true;
    } else if (mGetAbsoluteToleranceForX() > distance) {
        return true;
    }
    return mGetRelativeToleranceForX() * fuzzScale(x1, x2) > distance;
}

bool ZRXRealFunction::mIsConvergedForF(double f) const {
    const double magnitude = std::fabs(f);
    if (mAbsoluteToleranceForF >= magnitude) return true;
    return std::fabs(mScaleForF) * mRelativeToleranceForF >= magnitude;
}

bool equalWithinFuzz(double a, double b, double fuzz) {
    const double absolutePart = fuzz != 0.0 ? kFuzzPerMagnitude * fuzz : kDefaultAbsoluteFuzz;
    const double tolerance = kRelativeFuzz * fuzzScale(a, b) + absolutePart;
    return tolerance >= std::fabs(a - b);
}

double getFuzzMax(double x) {
    return x * kFuzzPerMagnitude;
}

bool mCompareFunction(double first, double second, bool active, bool preferSmaller) {
    if (!active) return false;
    if (std::isnan(first)) return true;
    if (preferSmaller ? second > first : first > second) return true;
    const double tolerance = kRelativeFuzz * fuzzScale(first, second) + kDefaultAbsoluteFuzz;
    return tolerance >= std::fabs(second - first);
}

}  // namespace kelstat
