// Minimum of a unimodal real function on an interval.
#ifndef KELSTAT_NUMERICS_GOLDEN_SECTION_H
#define KELSTAT_NUMERICS_GOLDEN_SECTION_H

namespace kelstat {

class ZRXRealFunction;

// Locates a minimum of f on [a, b] (normally a < b) by golden-section search, one evaluation per
// step, until f's argument test accepts the two interior points; returns their midpoint. For a
// maximum, hand in the negated function.
//
// NaN when f is NaN at either of the first two interior points. A NaN met later is not detected
// and moves the search towards b; a function that is not unimodal yields a local minimum or an
// end region. A search that has not converged after a fixed number of steps (a minimum at 0 can
// keep the relative test from ever holding) ends there with the current midpoint.
//
// With integerX set the answer is an integer: starting from floor of the lower interior point,
// the first integer n at which f(n) > f(n + 1) no longer holds (a walk that finds none within a
// fixed number of steps stops at the integer it has reached).
double calcGoldenSection(double a, double b, ZRXRealFunction& f, bool integerX);

}  // namespace kelstat

#endif  // KELSTAT_NUMERICS_GOLDEN_SECTION_H
