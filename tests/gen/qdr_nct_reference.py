#!/usr/bin/env python3
"""Reference quantiles of the noncentral t distribution at 20 significant digits (mpmath).

P(T <= t) for T = (Z + delta) / sqrt(V / df) is integrated over the normal variable:
for t > 0, P(T <= t) = Phi(-delta) + int_{-delta}^inf phi(z) Q(df/2, df ((z + delta)/t)^2 / 2) dz
and P(T > t) = int_{-delta}^inf phi(z) P(df/2, df ((z + delta)/t)^2 / 2) dz, with P, Q the
regularised incomplete gamma functions; t < 0 uses T -> -T, delta -> -delta. The quantile is
bracketed and refined with the Illinois method. Writes tests/data/qdr_nct_quantiles.csv.
"""
import sys
from mpmath import mp, mpf, sqrt, exp, erfc, gammainc, quad, findroot, inf, log, npdf, ncdf

mp.dps = 24


def tail(t, df, delta, upper):
    """P(T <= t), or P(T > t) when upper, for t > 0."""
    a = df / 2
    def breakpoints():
        centre = t - delta
        width = t / sqrt(2 * df) + 1
        pts = [-delta]
        for k in (-8, -4, -2, -1, 0, 1, 2, 4, 8):
            z = centre + k * width
            if z > -delta:
                pts.append(z)
        for z in (-8, -4, 0, 4, 8):
            if z > -delta:
                pts.append(mpf(z))
        pts = sorted(set(pts))
        return pts + [inf]
    pts = breakpoints()
    x = lambda z: df * ((z + delta) / t) ** 2 / 2
    if upper:
        return quad(lambda z: npdf(z) * gammainc(a, 0, x(z), regularized=True), pts)
    return ncdf(-delta) + quad(lambda z: npdf(z) * gammainc(a, x(z), inf, regularized=True), pts)


def lower_tail(t, df, delta):
    if t > 0:
        return tail(t, df, delta, False)
    if t < 0:
        return tail(-t, df, -delta, True)
    return ncdf(-delta)


def quantile(p, df, delta):
    p = mpf(p)
    z = sqrt(2) * mp.erfinv(2 * p - 1)
    t0 = delta + z * sqrt(1 + delta ** 2 / (2 * df))
    f = lambda t: lower_tail(t, df, delta) - p
    width = max(1, abs(t0) / 10)
    lo, hi = t0 - width, t0 + width
    while f(lo) > 0:
        lo -= width
        width *= 2
    while f(hi) < 0:
        hi += width
        width *= 2
    return findroot(f, (lo, hi), solver='illinois', tol=mpf(10) ** -21)


CASES = []
# One-sided normal tolerance factors: delta = z_p sqrt(n), df = n - 1, level 1 - alpha.
for n in (2, 10, 100, 1000, 10000, 1000000):
    for level, prop in ((0.90, 0.90), (0.95, 0.95), (0.99, 0.99), (0.95, 0.99)):
        zp = sqrt(2) * mp.erfinv(2 * mpf(prop) - 1)
        CASES.append((mpf(level), mpf(n - 1), zp * sqrt(n)))
# Extreme-value starts: delta = -sqrt(n) ln(-ln p'), df = n - 1.
for n in (3, 20, 1000, 1000000):
    for pprime in (0.01, 0.5, 0.99):
        CASES.append((mpf('0.95'), mpf(n - 1), -sqrt(n) * log(-log(mpf(pprime)))))
# Assorted: small df, negative ncp, both tails.
for p, df, delta in ((0.01, 3, 2), (0.999, 2, -1), (0.5, 1, 1), (0.05, 19, -30), (0.9, 5, 10),
                     (0.001, 7, -4), (0.3, 4.5, 0.25), (0.95, 1, 20), (0.99, 30, 60)):
    CASES.append((mpf(p), mpf(df), mpf(delta)))

out = sys.argv[1] if len(sys.argv) > 1 else 'tests/data/qdr_nct_quantiles.csv'
with open(out, 'w') as handle:
    handle.write('# Noncentral t quantiles P(T <= q) = p, 30 digits, mpmath quadrature of the\n')
    handle.write('# normal-mixture form (tests/gen/qdr_nct_reference.py)\n')
    handle.write('p,df,ncp,quantile\n')
    for p, df, delta in CASES:
        # Round the parameters to doubles first so that the test asks exactly this question.
        p, df, delta = mpf(float(p)), mpf(float(df)), mpf(float(delta))
        q = quantile(p, df, delta)
        handle.write('%s,%s,%s,%s\n' % (repr(float(p)), repr(float(df)), repr(float(delta)),
                                        mp.nstr(q, 20)))
        handle.flush()
        print(mp.nstr(p, 5), mp.nstr(df, 8), mp.nstr(delta, 8), mp.nstr(q, 20), flush=True)
