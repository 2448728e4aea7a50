// Noncentral quantiles: the chi-square with one degree of freedom (through normal functions) and
// the noncentral t (through a trapezoidal rule over the chi-square variable).
#include <algorithm>
#include <array>
#include <boost/math/distributions/non_central_t.hpp>
#include <boost/math/distributions/students_t.hpp>
#include <cmath>
#include <cstddef>
#include <limits>
#include <vector>

#include "qdr.h"
#include "qdr_detail.h"
#include "specfun/exponential.h"

namespace kelstat {
namespace qdr_detail {
namespace {

constexpr double kOneOverRootTwoPi = 0.398942280401432677939946059934;

double standardNormalDensity(double x) {
    return kOneOverRootTwoPi * exponential(-0.5 * (x * x));
}

// ---------------------------------------------------------------------------------------------
// Noncentral chi-square, one degree of freedom: X = (Z + mu)^2 with mu = sqrt(lambda), so
// P(X <= r^2) = Phi(r - mu) - Phi(-r - mu), and the quantile is a root in r.

// Halley steps with bisection fallback converge in 3-5 steps from the bracket's lower end; the
// cap only guards against a function that rounding keeps from settling.
constexpr int kOneDfMaxIterations = 100;

// Below r * mu = 1 (with r < mu) the two normal tails agree in their leading bits and their
// difference loses precision, so the probability is integrated directly instead.
constexpr double kOneDfDifferenceLimit = 1.0;

// 10-point Gauss-Legendre rule on [-1, 1], nonnegative half: nodes and weights (Abramowitz &
// Stegun, Table 25.4, n = 10), recomputed to 22 digits.
constexpr std::array<double, 5> kLegendreNodes = {
    0.1488743389816312108848, 0.4333953941292471907993, 0.6794095682990244062343,
    0.8650633666889845107321, 0.973906528517171720078};
constexpr std::array<double, 5> kLegendreWeights = {
    0.2955242247147528701739, 0.2692667193099963550912, 0.2190863625159820439955,
    0.1494513491505805931458, 0.06667134430868813759357};

// P(|Z + mu| <= r) for r < mu and r * mu < 1: 2 phi(mu) * integral_0^r exp(-t^2/2) cosh(mu t) dt,
// an entire integrand on a short interval, exact to rounding with ten nodes.
double oneDfCentralMass(double r, double mu) {
    const double half = 0.5 * r;
    double integral = 0.0;
    for (std::size_t i = 0; i < kLegendreNodes.size(); ++i) {
        const double t = half * kLegendreNodes[i];
        const double left = half - t;
        const double right = half + t;
        const double value = std::exp(-0.5 * (left * left)) * std::cosh(mu * left) +
                             std::exp(-0.5 * (right * right)) * std::cosh(mu * right);
        integral += kLegendreWeights[i] * value;
    }
    return 2.0 * standardNormalDensity(mu) * half * integral;
}

// P(X <= r^2), each branch free of cancellation in its region.
double oneDfLower(double r, double mu) {
    if (r >= mu) {
        // Two nonnegative error functions: no cancellation even where both tails are near 1/2.
        return 0.5 * (std::erf((r - mu) * M_SQRT1_2) + std::erf((r + mu) * M_SQRT1_2));
    }
    if (r * mu >= kOneDfDifferenceLimit) {
        return normalUpper(mu - r) - normalUpper(mu + r);
    }
    return oneDfCentralMass(r, mu);
}

// P(X > r^2): two positive tails.
double oneDfUpper(double r, double mu) {
    return normalUpper(r - mu) + normalLower(-r - mu);
}

// ---------------------------------------------------------------------------------------------
// Noncentral t: T = (Z + delta) / S with S = sqrt(V / df), V chi-square with df degrees of
// freedom, so P(T <= t) = E[Phi(t S - delta)]. With y = ln(V / df) the density of y is
// proportional to exp(-a (e^y - 1 - y)), a = df / 2: smooth, unimodal at y = 0 and decaying in
// both directions, so the trapezoidal rule on a uniform grid converges geometrically. The grid is
// normalised by its own sum, which removes the gamma-function constant.

// Grid points whose weight is below exp(-kWeightCutoff) relative to the mode are dropped: the mass
// left out is far below an ulp of any tail probability above 1e-12.
constexpr double kWeightCutoff = 50.0;

// Trapezoid step: geometric convergence needs the step well below the width of the analytic
// strip of the integrand. The density narrows like 1/sqrt(a) and the normal factor's transition
// like 1/|delta|; the constants keep the discretisation error below 1e-17.
constexpr double kMaxGridStep = 0.15;
constexpr double kGridStepScale = 0.6;

// Beyond this many points (small df with a huge noncentrality) the grid is not worth its cost.
constexpr std::size_t kMaxGridPoints = 40000;

// Beyond this noncentrality the series behind the fallback would be too long to run.
constexpr double kMaxFallbackNoncentrality = 5000.0;

// Halley steps with bisection fallback; convergence usually takes 3-4 passes over the grid from
// the start below (at most 13 over p from 0.001 to 0.999, df from 1 to 999 and noncentrality from
// -30 to 30), and the doubling step limit reaches any double within a few hundred.
constexpr int kTMaxIterations = 400;

// A Halley step below this fraction of the iterate is the last one needed (see the iteration).
constexpr double kFinalHalleyStep = 1e-7;

// The boundary iteration for the grid range converges in a handful of steps; exactness is not
// needed there.
constexpr int kRangeIterations = 100;

// 1/(k+2)! for k = 0..14: (e^y - 1 - y) / y^2 as a polynomial, to 1e-17 relative for |y| <= 1/2.
constexpr std::array<double, 15> makeExpRemainderCoefficients() {
    std::array<double, 15> table{};
    long double factorial = 2.0L;
    for (std::size_t k = 0; k < table.size(); ++k) {
        table[k] = static_cast<double>(1.0L / factorial);
        factorial *= static_cast<long double>(k + 3);
    }
    return table;
}
constexpr std::array<double, 15> kExpRemainder = makeExpRemainderCoefficients();
constexpr double kExpRemainderSeriesLimit = 0.5;

// e^y - 1 - y without cancellation near 0.
double expRemainder(double y) {
    if (std::fabs(y) > kExpRemainderSeriesLimit) {
        return std::expm1(y) - y;
    }
    double polynomial = kExpRemainder.back();
    for (std::size_t k = kExpRemainder.size() - 1; k-- > 0;) {
        polynomial = polynomial * y + kExpRemainder[k];
    }
    return y * y * polynomial;
}

// Root of e^y - 1 - y = level on the side of 0 given by the start (convex, so Newton from the
// outer side approaches monotonically).
double expRemainderRoot(double level, double start) {
    double y = start;
    for (int i = 0; i < kRangeIterations; ++i) {
        const double slope = std::expm1(y);
        const double step = (expRemainder(y) - level) / slope;
        y -= step;
        if (std::fabs(step) <= 1e-6 * std::fabs(y)) {
            break;
        }
    }
    return y;
}

struct TailAndDensity {
    double tail;
    double density;
    double densitySlope;
};

class NoncentralTGrid {
  public:
    NoncentralTGrid(double df, double ncp) : noncentrality_(ncp) {
        const double a = 0.5 * df;
        const double level = kWeightCutoff / a;
        const double upper = expRemainderRoot(level, std::sqrt(2.0 * level));
        const double lower = expRemainderRoot(level, -level - 1.0);
        const double step =
            std::min(kMaxGridStep, kGridStepScale / std::sqrt(a + 0.25 * (ncp * ncp) + 1.0));
        const double first = std::ceil(lower / step);
        const double last = std::floor(upper / step);
        if (!(last - first + 1.0 <= static_cast<double>(kMaxGridPoints))) {
            return;
        }
        const auto count = static_cast<std::size_t>(last - first + 1.0);
        weights_.resize(count);
        scales_.resize(count);
        double total = 0.0;
        for (std::size_t j = 0; j < count; ++j) {
            const double y = (first + static_cast<double>(j)) * step;
            weights_[j] = exponential(-a * expRemainder(y));
            scales_[j] = exponential(0.5 * y);
            total += weights_[j];
        }
        for (double& weight : weights_) {
            weight /= total;
        }
    }

    bool usable() const { return !weights_.empty(); }

    // P(T <= t) (or P(T > t) when upperTail), the density at t and its derivative.
    TailAndDensity evaluate(double t, bool upperTail) const {
        double tail = 0.0;
        double density = 0.0;
        double densitySlope = 0.0;
        for (std::size_t j = 0; j < weights_.size(); ++j) {
            const double argument = t * scales_[j] - noncentrality_;
            tail += weights_[j] * (upperTail ? normalUpper(argument) : normalLower(argument));
            const double term = weights_[j] * scales_[j] * standardNormalDensity(argument);
            density += term;
            densitySlope -= term * scales_[j] * argument;
        }
        return {tail, density, densitySlope};
    }

  private:
    double noncentrality_;
    std::vector<double> weights_;
    std::vector<double> scales_;
};

// Normal approximation to the quantile (Abramowitz & Stegun 26.7.10 solved for t), with a crude
// fallback where the approximation has no solution; only a starting point.
double noncentralTStart(double p, double df, double ncp) {
    const double z = normalQuantile(p);
    const double b = 1.0 - 0.25 / df;
    const double k = z * z / (2.0 * df);
    const double denominator = b * b - k;
    const double radicand = b * b + (ncp * ncp - z * z) / (2.0 * df);
    if (denominator > 0.1 && radicand > 0.0) {
        return (b * ncp + z * std::sqrt(radicand)) / denominator;
    }
    return ncp + z * std::sqrt(1.0 + ncp * ncp / (2.0 * df));
}

double noncentralTFallback(double p, double df, double ncp) {
    if (std::fabs(ncp) > kMaxFallbackNoncentrality) {
        return kNaN;
    }
    return boost::math::quantile(
        boost::math::non_central_t_distribution<double, AccuratePolicy>(df, ncp), p);
}

}  // namespace

double chiSquareOneDfTail(bool upperTail, double x, double lambda) {
    const double r = std::sqrt(x);
    const double mu = std::sqrt(lambda);
    return upperTail ? oneDfUpper(r, mu) : oneDfLower(r, mu);
}

double chiSquareOneDfQuantile(double p, double lambda) {
    const double mu = std::sqrt(lambda);
    // The root lies in [max(mu + z_p, z_{(1+p)/2}), mu + z_{(1+p)/2}]: P(|Z + mu| <= r) is at most
    // P(|Z| <= r) and at most Phi(r - mu), and at least 1 - 2 Phi(mu - r). The quantiles only
    // bound the search, so the rough ones serve, with the bracket widened well beyond their error.
    constexpr double kBracketWidening = 64.0 * kEpsilon;
    const double symmetricQuantile = -roughNormalQuantile(0.5 * (1.0 - p));
    const double lowerQuantile = roughNormalQuantile(p);
    double low = std::max({0.0, mu + lowerQuantile, symmetricQuantile});
    double high = mu + symmetricQuantile;
    low *= 1.0 - kBracketWidening;
    high = high * (1.0 + kBracketWidening) + std::numeric_limits<double>::min();
    // Solve in whichever tail is the smaller one; 1 - p is exact for p > 1/2.
    const bool useUpper = p > 0.5;
    const double target = useUpper ? 1.0 - p : p;
    double r = low;
    for (int iteration = 0; iteration < kOneDfMaxIterations; ++iteration) {
        // Residual increasing in r in both cases.
        const double residual = useUpper ? target - oneDfUpper(r, mu) : oneDfLower(r, mu) - target;
        if (residual == 0.0) {
            return r * r;
        }
        if (residual < 0.0) {
            low = r;
        } else {
            high = r;
        }
        const double densityLeft = standardNormalDensity(r - mu);
        const double densityRight = standardNormalDensity(r + mu);
        const double slope = densityLeft + densityRight;
        const double curvature = -(r - mu) * densityLeft - (r + mu) * densityRight;
        double step = residual / slope;
        const double halleyFactor = 1.0 - 0.5 * step * curvature / slope;
        if (halleyFactor > 0.5) {
            step /= halleyFactor;
        }
        // Converged steps are tested before the bracket: rounded onto r they would look like a
        // step outside it.
        if (std::fabs(step) <= 2.0 * kEpsilon * r) {
            return (r - step) * (r - step);
        }
        double next = r - step;
        if (!(next > low && next < high)) {
            next = 0.5 * (low + high);
        }
        if (high - low <= 2.0 * kEpsilon * high) {
            return next * next;
        }
        r = next;
    }
    return r * r;
}

double noncentralTQuantile(double p, double df, double ncp) {
    const NoncentralTGrid grid(df, ncp);
    if (!grid.usable()) {
        return noncentralTFallback(p, df, ncp);
    }
    const bool useUpper = p > 0.5;
    const double target = useUpper ? 1.0 - p : p;
    // Residual increasing in t: lower tail minus target, or target minus upper tail; its first
    // and second derivatives are the density and the density's slope in both cases.
    auto residualAt = [&](double t, double* slope, double* curvature) {
        const TailAndDensity value = grid.evaluate(t, useUpper);
        *slope = value.density;
        *curvature = value.densitySlope;
        return useUpper ? target - value.tail : value.tail - target;
    };

    double t = noncentralTStart(p, df, ncp);
    double slope = 0.0;
    double curvature = 0.0;
    double residual = residualAt(t, &slope, &curvature);
    if (!std::isfinite(t) || std::isnan(residual)) {
        return kNaN;
    }
    // Halley from the start (Newton where its correction is large: far from the root). Each step
    // costs a pass over the grid, so the third-order steps pay for the density's slope. Until a
    // residual of each sign has been seen, a step may not exceed a width that doubles each time it
    // binds, so a poor start in a flat tail cannot throw the iterate away; once bracketed, steps
    // leaving the bracket are replaced by bisection.
    double low = -kInfinity;
    double high = kInfinity;
    double maxStep = std::max(1.0, std::fabs(t));
    for (int iteration = 0; iteration < kTMaxIterations; ++iteration) {
        if (residual == 0.0) {
            return t;
        }
        if (residual < 0.0) {
            low = t;
        } else {
            high = t;
        }
        const bool bracketed = std::isfinite(low) && std::isfinite(high);
        double step = slope > 0.0 ? residual / slope : kInfinity;
        bool halley = false;
        if (std::isfinite(step)) {
            // Only a moderate correction: far out in a flat tail the factor grows large and
            // would shrink the steps to a crawl.
            const double halleyFactor = 1.0 - 0.5 * step * curvature / slope;
            if (halleyFactor > 0.5 && halleyFactor < 2.0) {
                step /= halleyFactor;
                halley = true;
            }
        }
        // A Halley step this small leaves an error of the order of its cube (the passes above
        // show ratios near 10 between an error and the cube of the one before): far below an ulp,
        // so the pass that would only confirm it is saved.
        if (halley && std::fabs(step) <= kFinalHalleyStep * std::fabs(t)) {
            return t - step;
        }
        if (!bracketed && !(std::fabs(step) <= maxStep)) {
            step = residual > 0.0 ? maxStep : -maxStep;
            maxStep *= 2.0;
        }
        const double tolerance = 2.0 * kEpsilon * std::fabs(t);
        if (std::fabs(step) <= tolerance) {
            return t - step;
        }
        double next = t - step;
        if (bracketed && !(next > low && next < high)) {
            next = 0.5 * (low + high);
        }
        if (bracketed && high - low <= tolerance) {
            return next;
        }
        t = next;
        residual = residualAt(t, &slope, &curvature);
        if (std::isnan(residual)) {
            return kNaN;
        }
    }
    return kNaN;
}

}  // namespace qdr_detail
}  // namespace kelstat

double qdr_GetTInvCdf(double p, double df, double ncp) {
    if (!(p >= 0.0 && p <= 1.0) || !(df > 0.0) || !std::isfinite(ncp)) {
        return kelstat::qdr_detail::kNaN;
    }
    if (p == 0.0) {
        return -kelstat::qdr_detail::kInfinity;
    }
    if (p == 1.0) {
        return kelstat::qdr_detail::kInfinity;
    }
    if (std::isinf(df)) {
        return ncp + kelstat::qdr_detail::normalQuantile(p);
    }
    if (ncp == 0.0) {
        return boost::math::quantile(
            boost::math::students_t_distribution<double, kelstat::qdr_detail::AccuratePolicy>(df),
            p);
    }
    return kelstat::qdr_detail::noncentralTQuantile(p, df, ncp);
}
