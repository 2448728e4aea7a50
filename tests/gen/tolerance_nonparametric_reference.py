#!/usr/bin/env python3
"""Order-statistic indices and achieved confidence of nonparametric tolerance limits, from exact
binomial sums at 40 digits (mpmath). Writes tests/data/tolerance_nonparametric.csv.

At an integer k the beta probability is a binomial tail: I_x(k, n - k + 1) = P(Bin(n, x) >= k).
The continuous index equation falls through zero once, so the floor of its root is the largest
integer k whose tail still reaches the target:
  one-sided: largest k with P(Bin(n, 1 - p) >= k) >= confidence; lower index r = max(1, k), upper
    index n + 1 - r; achieved = 100 P(Bin(n, 1 - p) >= r);
  two-sided: largest m with P(Bin(n, p) >= m) >= alpha; h = (n - m) / 2, r = max(1, floor h),
    s = min(floor(n - h + 1), n), d = s - r; achieved = 100 (1 - P(Bin(n, p) >= d)).
The margin column is the distance of the deciding tail from its target; a row with a margin
below 1e-9 would make the floor sensitive to rounding (none occurs in this grid).

Run from the repository root: python3 tests/gen/tolerance_nonparametric_reference.py
"""
from mpmath import mp, mpf, binomial, nstr, floor

mp.dps = 40

CASES = [("0.90", "0.90"), ("0.95", "0.95"), ("0.99", "0.99"), ("0.95", "0.90"),
         ("0.90", "0.99"), ("0.99", "0.75")]


def upper_tails(n, x):
    """tails[k] = P(Bin(n, x) >= k) for k = 0..n+1."""
    terms = [binomial(n, j) * x ** j * (1 - x) ** (n - j) for j in range(n + 1)]
    tails = [mpf(0)] * (n + 2)
    for k in range(n, -1, -1):
        tails[k] = tails[k + 1] + terms[k]
    return tails


def largest_reaching(tails, target):
    k = 0
    for j in range(1, len(tails)):
        if tails[j] >= target:
            k = j
    return k, min(abs(tails[j] - target) for j in range(1, len(tails)))


def main():
    out = open("tests/data/tolerance_nonparametric.csv", "w")
    out.write("# Nonparametric tolerance indices (one-based) and achieved confidence in percent,\n")
    out.write("# exact binomial tails at 40 digits (tests/gen/tolerance_nonparametric_reference.py)\n")
    out.write("type,confidence,proportion,n,lower_index,upper_index,achieved_percent,margin\n")
    for conf_text, prop_text in CASES:
        conf, prop = mpf(conf_text), mpf(prop_text)
        alpha = 1 - conf
        for n in range(2, 501):
            tails_low = upper_tails(n, 1 - prop)
            k, margin = largest_reaching(tails_low, conf)
            r = max(1, k)
            achieved = 100 * tails_low[r] if r <= n else mpf(0)
            for kind in (-1, 1):
                out.write("%d,%s,%s,%d,%d,%d,%s,%s\n" % (kind, conf_text, prop_text, n, r,
                          min(n + 1 - r, n), nstr(achieved, 25), nstr(margin, 3)))
            tails_p = upper_tails(n, prop)
            m, margin = largest_reaching(tails_p, alpha)
            h = mpf(n - m) / 2
            r = max(1, int(floor(h)))
            s = min(int(floor(n - h + 1)), n)
            d = s - r
            if d <= 0:
                achieved = mpf(0)
            elif d >= n + 1:
                achieved = mpf(100)
            else:
                achieved = 100 * (1 - tails_p[d])
            out.write("0,%s,%s,%d,%d,%d,%s,%s\n" % (conf_text, prop_text, n, r, s,
                      nstr(achieved, 25), nstr(margin, 3)))


main()
