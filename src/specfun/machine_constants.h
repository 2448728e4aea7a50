// Machine constants of IEEE 754 double precision, in the numbering of the PORT library's
// I1MACH and D1MACH that the published special-function algorithms query.
#ifndef KELSTAT_SPECFUN_MACHINE_CONSTANTS_H
#define KELSTAT_SPECFUN_MACHINE_CONSTANTS_H

#include <limits>

namespace kelstat {

// Integer constants: 14 = binary digits of the double mantissa (53), 15 = smallest binary
// exponent (-1021), 16 = largest binary exponent (1024). Fixed rather than queried, so results
// do not depend on the host. Any other index returns 0.
constexpr int I1MACH(int index) {
    switch (index) {
        case 14:
            return 53;
        case 15:
            return -1021;
        case 16:
            return 1024;
        default:
            return 0;
    }
}

// Floating-point constants: 4 = the spacing of doubles at 1 (2^-52), 5 = log10(2). Any other
// index returns NaN, so a misuse shows in the results instead of passing as a plausible number.
constexpr double D1MACH(int index) {
    switch (index) {
        case 4:
            return 2.220446049250313e-16;
        case 5:
            return 0.3010299956639812;
        default:
            return std::numeric_limits<double>::quiet_NaN();
    }
}

}  // namespace kelstat

#endif  // KELSTAT_SPECFUN_MACHINE_CONSTANTS_H
