// Whole powers by binary powering in x87 extended precision: its eleven extra bits absorb the
// rounding of the few products, so one final rounding to double leaves the power as accurate as
// pow, at a fraction of its cost. Only where long double is the 64-bit-mantissa format; elsewhere
// callers use pow.
#ifndef KELSTAT_SPECFUN_EXTENDED_POWER_H
#define KELSTAT_SPECFUN_EXTENDED_POWER_H

#include <cmath>
#include <limits>

namespace kelstat {

constexpr bool kExtendedPowerAvailable = std::numeric_limits<long double>::digits == 64;

// Exponents up to this keep the relative error of the extended product below 2^-57 (each
// squaring at most doubles it), so the rounded power is within about half an ulp.
constexpr unsigned kMaxExtendedExponent = 64;

// start x base^exponent, the factors of base multiplied into start from the lowest bit up.
inline long double extendedPower(long double start, long double base, unsigned exponent) {
    long double power = start;
    for (; exponent > 0; exponent /= 2) {
        if (exponent % 2 != 0) power *= base;
        if (exponent > 1) base *= base;
    }
    return power;
}

// base^n for a whole n >= 0.
inline double wholePower(double base, double n) {
    if (kExtendedPowerAvailable && n <= static_cast<double>(kMaxExtendedExponent)) {
        return static_cast<double>(extendedPower(1.0L, base, static_cast<unsigned>(n)));
    }
    return std::pow(base, n);
}

}  // namespace kelstat

#endif  // KELSTAT_SPECFUN_EXTENDED_POWER_H
