// Zero of a real function inside a bracket.
#ifndef KELSTAT_NUMERICS_ROOT_FINDER_H
#define KELSTAT_NUMERICS_ROOT_FINDER_H

namespace kelstat {

class ZRXRealFunction;

// Finds a zero of f between x0 and x1 (either order) by regula falsi in which the value kept at
// the end that stays is halved on every iteration. Stops when f's value test accepts the new
// point or f's argument test accepts the bracket as it stood before the step; tolerances come
// from f alone.
//
// Ends without a strict sign change give x0 (or else x1) when f is already converged there, and
// NaN otherwise. NaN also comes back when f is NaN at either end (after those two evaluations),
// at an interior point, or when the iteration does not settle within a fixed number of steps.
//
// When f's integer flag is set the answer is an integer: the floor of the lower end of the final
// bracket when its end values do not straddle zero, otherwise the first integer above it whose
// value has the sign of the upper end's (or is zero). A bracket given high end first is walked
// from its lower end as well.
double ZRXRootFinder(double x0, double x1, ZRXRealFunction& f);

}  // namespace kelstat

#endif  // KELSTAT_NUMERICS_ROOT_FINDER_H
