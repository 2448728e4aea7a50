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
        return quad(lambda z: npdf(z) * gamma_lower(a, x(z)), pts)
    return ncdf(-delta) + quad(lambda z: npdf(z) * gamma_upper(a, x(z)), pts)


# Each regularised tail from the side where mpmath's series converges (the smaller argument
# side uses the lower series); the complement is taken only where it is at least about 1/2.
def gamma_lower(a, x):
    if x < a:
        return gammainc(a, 0, x, regularized=True)
    return 1 - gammainc(a, x, inf, regularized=True)


def gamma_upper(a, x):
    if x < a:
        return 1 - gammainc(a, 0, x, regularized=True)
    return gammainc(a, x, inf, regularized=True)


def lower_tail_chi(t, df, delta):
    """P(T <= t) = E[Phi(t S - delta)] over y = ln(V / df), whose density is
    a^a / Gamma(a) exp(a (y - e^y)), a = df / 2: used for large df, where mpmath's incomplete
    gamma series give up."""
    a = df / 2
    log_norm = a * log(a) - mp.loggamma(a)
    width = 1 / sqrt(a)
    pts = sorted(set([k * width for k in (-40, -12, -8, -4, -2, -1, 0, 1, 2, 4, 8, 12, 40)]))
    if t != 0 and delta / t > 0:
        centre = 2 * log(delta / t)
        if pts[0] < centre < pts[-1]:
            pts = sorted(set(pts + [centre]))
    density = lambda y: exp(log_norm + a * (y - exp(y)))
    if t > 0:
        upper = quad(lambda y: density(y) * ncdf(delta - t * exp(y / 2)), pts)
        return 1 - upper if upper < 0.5 else quad(lambda y: density(y) * ncdf(t * exp(y / 2) - delta), pts)
    return quad(lambda y: density(y) * ncdf(t * exp(y / 2) - delta), pts)


def lower_tail(t, df, delta):
    if df > 500:
        return lower_tail_chi(t, df, delta)
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

# A second argument resumes after that many cases, appending to the file.
out = sys.argv[1] if len(sys.argv) > 1 else 'tests/data/qdr_nct_quantiles.csv'
skip = int(sys.argv[2]) if len(sys.argv) > 2 else 0
with open(out, 'a' if skip else 'w') as handle:
    if not skip:
        handle.write('# Noncentral t quantiles P(T <= q) = p, 20 digits, mpmath quadrature of the\n')
        handle.write('# normal-mixture form (tests/gen/qdr_nct_reference.py)\n')
        handle.write('p,df,ncp,quantile\n')
    for p, df, delta in CASES[skip:]:
        # Round the parameters to doubles first so that the test asks exactly this question.
        p, df, delta = mpf(float(p)), mpf(float(df)), mpf(float(delta))
        q = quantile(p, df, delta)
        handle.write('%s,%s,%s,%s\n' % (repr(float(p)), repr(float(df)), repr(float(delta)),
                                        mp.nstr(q, 20)))
        handle.flush()
        print(mp.nstr(p, 5), mp.nstr(df, 8), mp.nstr(delta, 8), mp.nstr(q, 20), flush=True)
