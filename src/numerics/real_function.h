// Real functions of one real variable that carry their own convergence tolerances, and the
// library's fuzzy comparisons of doubles.
#ifndef KELSTAT_NUMERICS_REAL_FUNCTION_H
#define KELSTAT_NUMERICS_REAL_FUNCTION_H

namespace kelstat {

// Abstract real function of one real variable. The one-dimensional routines (root finder,
// quadrature, golden-section search) take no tolerances of their own: they ask the function object
// whether two arguments or one value count as converged. A derived class supplies the evaluation
// and, if it wants other tolerances, sets the members in its constructor or overrides the getters.
class ZRXRealFunction {
  public:
    ZRXRealFunction() = default;

    // Copies the six tolerance members only; the target keeps its own dynamic type.
    virtual ZRXRealFunction& operator=(const ZRXRealFunction& other);
    virtual ~ZRXRealFunction() = default;

    // Non-const: an evaluation may update caches of the derived object.
    virtual double operator()(double x) = 0;

    // Not a slot: lets the root finder choose its integer ending.
    bool mGetIntegerX() const { return mIntegerX; }

    virtual double mGetAbsoluteToleranceForX() const;
    virtual double mGetRelativeToleranceForX() const;
    virtual double mGetAbsoluteToleranceForF() const;
    virtual double mGetRelativeToleranceForF() const;

    // True when x1 and x2 agree: |x1 - x2| < 2 in integer mode, otherwise below the absolute
    // tolerance; failing that, below the relative tolerance times the larger magnitude. Strict
    // comparisons, tolerances read through the getters; false when either argument is NaN.
    virtual bool mIsConvergedForX(double x1, double x2) const;

    // True when |f| is at most the absolute tolerance or at most |mScaleForF| times the relative
    // tolerance. Reads the members directly; false for NaN.
    virtual bool mIsConvergedForF(double f) const;

  protected:
    // Derived function objects may be copied; the base part is plain data.
    ZRXRealFunction(const ZRXRealFunction&) = default;

    bool mIntegerX = false;   // the argument takes integer values only
    double mScaleForF = 0.0;  // magnitude behind the relative tolerance on values
    double mAbsoluteToleranceForX = 1e-30;
    double mRelativeToleranceForX = 1e-12;
    double mAbsoluteToleranceForF = 1e-30;
    double mRelativeToleranceForF = 1e-12;
};

// Whether a and b are equal within the library's fuzz: |a - b| <= 1e-12 * max(|a|, |b|) plus an
// absolute part of 1e-14 * fuzz (1e-30 when fuzz is 0). A negative fuzz narrows the tolerance.
// False when a, b or fuzz is NaN.
bool equalWithinFuzz(double a, double b, double fuzz);

// The absolute fuzz that belongs to a magnitude x: x * 1e-14.
double getFuzzMax(double x);

// Whether `first` is at least as good as `second`: smaller is better when preferSmaller is set,
// larger otherwise, and two values equal within the fuzz count as equally good. Always false when
// active is false; a NaN first counts as good.
bool mCompareFunction(double first, double second, bool active, bool preferSmaller);

}  // namespace kelstat

#endif  // KELSTAT_NUMERICS_REAL_FUNCTION_H
