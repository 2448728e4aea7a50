#!/usr/bin/env python3
"""Two-sided exponential tolerance factors at 40 digits (mpmath), printed to 30.
Writes tests/data/exponential_two_sided.csv.

For n observations, alpha = 1 - confidence and proportion p, the solution (x1, x2, v) satisfies
  v^x - (1 - v)^x = p at x = x1 and x = x2 (x1 < x2), and
  P(x1 < X / (2n) < x2) = 1 - alpha for X chi-square with 2n degrees of freedom.
Here u = 1 - v is the unknown: for each u the two roots x1(u) < x2(u) are bracketed on either
side of the content's maximum and found by the Illinois method; then the coverage
equation is solved for log(u) on a bracket. The factors are -ln v and -ln(1 - v).
The column `band` is 1 where u lies within 1e-12 of 0 (v equal to 1 within the library's fuzz):
there the objective declares the point invalid and the library reports NaN.

Run from the repository root: python3 tests/gen/exponential_two_sided_reference.py
"""
import sys
from mpmath import mp, mpf, log, log1p, exp, gammainc, nstr

mp.dps = 40

SIZES = [1, 2, 3, 4, 5, 7, 10, 15, 20, 30, 50, 100, 300, 1000]
LEVELS = ["0.90", "0.95", "0.99"]


def bracket_root(f, a, b):
    """Root of f on [a, b] (f(a), f(b) of opposite signs) by the Illinois method."""
    fa, fb = f(a), f(b)
    side = 0
    for _ in range(1000):
        c = (a * fb - b * fa) / (fb - fa)
        fc = f(c)
        if fc == 0 or abs(b - a) <= mpf(10) ** (-mp.dps + 3) * max(abs(a), abs(b), 1):
            return c
        if (fc > 0) == (fb > 0):
            b, fb = c, fc
            if side == -1:
                fa /= 2
            side = -1
        else:
            a, fa = c, fc
            if side == 1:
                fb /= 2
            side = 1
    raise ValueError("no convergence")


def content(x, lv, lu, p):
    return exp(x * lv) - exp(x * lu) - p


def ratio_bounds(u, p):
    """Roots x1 < x2 of v^x - u^x = p, or None when the content never reaches p."""
    lv = log1p(-u)
    lu = log(u)
    peak = log(lu / lv) / (lv - lu)
    if content(peak, lv, lu, p) <= 0:
        return None
    f = lambda x: content(x, lv, lu, p)
    x1 = bracket_root(f, mpf(0), peak)
    high = 2 * peak
    while f(high) > 0:
        high *= 2
    x2 = bracket_root(f, peak, high)
    return x1, x2


def coverage_gap(log_u, n, alpha, p):
    u = exp(log_u)
    bounds = ratio_bounds(u, p)
    if bounds is None:
        return -(1 - alpha)
    x1, x2 = bounds
    # P(X <= 2n x) for X chi-square with 2n degrees of freedom is P(n, n x) regularized.
    return gammainc(n, n * x1, n * x2, regularized=True) - (1 - alpha)


def largest_log_u(p):
    """log u at which the content's maximum equals p: beyond it there are no ratio bounds."""
    low, high = mpf(-700), log(mpf("0.5"))
    for _ in range(200):
        mid = (low + high) / 2
        if ratio_bounds(exp(mid), p) is None:
            high = mid
        else:
            low = mid
    return low


def solve(n, alpha, p):
    top = largest_log_u(p)
    low = mpf(-700)
    f = lambda t: coverage_gap(t, n, alpha, p)
    if f(low) < 0:
        raise ValueError("no root above u = e^-700")
    t = bracket_root(f, low, top)
    u = exp(t)
    x1, x2 = ratio_bounds(u, p)
    return x1, x2, 1 - u, u


def main():
    out = sys.argv[1] if len(sys.argv) > 1 else "tests/data/exponential_two_sided.csv"
    with open(out, "w") as stream:
        stream.write("# Two-sided exponential tolerance solution (x1, x2, v) and factors -ln v, -ln(1 - v),\n")
        stream.write("# solved at 40 digits with mpmath by tests/gen/exponential_two_sided_reference.py;\n")
        stream.write("# band = 1 where 1 - v <= 1e-12 (unreachable by the objective: NaN expected).\n")
        stream.write("n,confidence,proportion,x1,x2,v,lower_k,upper_k,band\n")
        for n in SIZES:
            for confidence in LEVELS:
                for proportion in LEVELS:
                    alpha = 1 - mpf(confidence)
                    x1, x2, v, u = solve(n, alpha, mpf(proportion))
                    band = 1 if u <= mpf("1e-12") else 0
                    row = [str(n), confidence, proportion] + [
                        nstr(value, 30, min_fixed=-5, max_fixed=5)
                        for value in (x1, x2, v, -log1p(-u), -log(u))
                    ] + [str(band)]
                    stream.write(",".join(row) + "\n")
                    stream.flush()


if __name__ == "__main__":
    main()
