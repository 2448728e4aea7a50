#include "numerics/root_finder.h"

#include <cmath>
#include <limits>

#include "numerics/real_function.h"

namespace kelstat {

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// Converging runs need well under a hundred steps; the halving guarantees progress, so only a
// function that is infinite or erratic inside the bracket can get this far. Such runs give NaN.
constexpr int kMaxIterations = 10000;

// The integer walk normally crosses the final bracket in a step or two; a walk this long means the
// sign change is nowhere near it (or the integers no longer step at this magnitude). NaN then.
constexpr int kMaxIntegerSteps = 1 << 20;

// Only a strictly negative value against a strictly positive one brackets a root; zero counts as
// neither sign.
bool haveOppositeSigns(double fa, double fb) {
    return (fa < 0.0 && fb > 0.0) || (fa > 0.0 && fb < 0.0);
}

struct BracketEnd {
    double x;
    double f;
};

// The integer ending: from the lower end, walk up to the first integer at or beyond the sign
// change. `lower` and `upper` are the ends of the final bracket with their (possibly halved)
// values, which decide whether a sign change still lies between them.
double integerAnswer(const BracketEnd& lower, const BracketEnd& upper, ZRXRealFunction& f) {
    double n = std::floor(lower.x);
    if (!(lower.f * upper.f < 0.0)) return n;
    for (int step = 0; step < kMaxIntegerSteps; ++step) {
        n += 1.0;
        if (!(f(n) * upper.f < 0.0)) return n;
    }
    return kNaN;
}

double finish(double answer, const BracketEnd& left, const BracketEnd& right, ZRXRealFunction& f) {
    if (!f.mGetIntegerX()) return answer;
    // Keep the walk upward whichever way round the caller gave the bracket.
    return left.x <= right.x ? integerAnswer(left, right, f) : integerAnswer(right, left, f);
}

}  // namespace

double ZRXRootFinder(double x0, double x1, ZRXRealFunction& f) {
    BracketEnd left{x0, f(x0)};
    BracketEnd right{x1, f(x1)};
    if (std::isnan(left.f) || std::isnan(right.f)) return kNaN;

    if (!haveOppositeSigns(left.f, right.f)) {
        // No bracket: an end is acceptable only if it is a root already. Its integer form is the
        // plain floor, since the end values cannot straddle zero.
        double answer = kNaN;
        if (f.mIsConvergedForF(left.f)) {
            answer = x0;
        } else if (f.mIsConvergedForF(right.f)) {
            answer = x1;
        }
        return f.mGetIntegerX() ? std::floor(answer) : answer;
    }

    for (int iteration = 0; iteration < kMaxIterations; ++iteration) {
        const double ratio = left.f / (right.f - left.f);
        const double candidate = left.x - (right.x - left.x) * ratio;
        const double value = f(candidate);
        if (f.mIsConvergedForF(value) || f.mIsConvergedForX(left.x, right.x)) {
            return finish(candidate, left, right, f);
        }
        // A NaN inside the bracket poisons every later secant point, so no answer can follow.
        if (std::isnan(value)) return kNaN;

        // Halving the value of the end that stays pulls the next secant point towards it, so the
        // far end cannot stall; the signs, and with them the choice of side, are unaffected.
        if ((left.f > 0.0) != (value > 0.0)) {
            left.f *= 0.5;
            right = {candidate, value};
        } else {
            right.f *= 0.5;
            left = {candidate, value};
        }
    }
    return kNaN;
}

}  // namespace kelstat
