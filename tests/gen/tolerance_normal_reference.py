#!/usr/bin/env python3
"""Normal tolerance K-factors at 32 digits (mpmath), printed to 25.
Writes tests/data/tolerance_normal_kfactors.csv.

one-sided: k = t'/sqrt(n), t' the (1 - alpha)-quantile of the noncentral t with n - 1 degrees of
  freedom and noncentrality z_p sqrt(n); its distribution function is integrated over the
  chi-square variable V: P(T <= t) = E[Phi(t sqrt(V / (n - 1)) - delta)].
two-sided: the root K = 1/t of G(t) = 2 I(t) - 1 + alpha, I(t) the 36-point Gauss-Legendre sum
  over [0, 8.3] of Q((n-1)/2, (n-1) r^2(x) t^2 / 2) phi(x), where r^2(x) solves
  Phi(r - x/sqrt(n)) - Phi(-r - x/sqrt(n)) = p. Nodes are Newton-refined roots of P_36. This is
  the truncated 36-point definition itself, not the exact (untruncated) factor.

Run from the repository root: python3 tests/gen/tolerance_normal_reference.py
It takes about an hour; to share it out, run parts with an output file and the sizes to do,
e.g. `... /tmp/part.csv 3000 10000`, and concatenate the rows in size order.
"""
import sys
from mpmath import mp, mpf, sqrt, exp, log, loggamma, ncdf, npdf, quad, findroot, gammainc, \
    legendre, cos, pi, nstr, erfinv, inf

mp.dps = 32

SIZES = [2, 3, 4, 5, 7, 10, 15, 20, 30, 50, 100, 300, 1000, 3000, 10000]
LEVELS = ["0.90", "0.95", "0.99"]


def normal_quantile(p):
    return sqrt(2) * erfinv(2 * p - 1)


def t_lower_tail(t, df, delta):
    a = df / 2
    def integrand(v):
        return ncdf(t * sqrt(v / df) - delta) * exp((a - 1) * log(v) - v / 2 - a * log(2) - loggamma(a))
    spread = sqrt(2 * df)
    points = sorted({mpf(0)} | {df + k * spread for k in (-12, -6, -3, -1, 0, 1, 3, 6, 12)
                                if df + k * spread > 0})
    return quad(integrand, points + [inf])


def one_sided(n, conf, prop):
    df = mpf(n - 1)
    delta = normal_quantile(prop) * sqrt(n)
    guess = delta + normal_quantile(conf) * sqrt(1 + delta ** 2 / (2 * df))
    root = findroot(lambda t: t_lower_tail(t, df, delta) - conf, (guess, guess * mpf("1.05")),
                    solver="secant", tol=mpf(10) ** -28)
    return root / sqrt(n)


def gauss_legendre_36():
    nodes, weights = [], []
    order = 36
    for i in range(1, order // 2 + 1):
        x = cos(pi * (i - mpf(1) / 4) / (order + mpf(1) / 2))
        for _ in range(100):
            p0, p1 = mpf(1), x
            for k in range(2, order + 1):
                p0, p1 = p1, ((2 * k - 1) * x * p1 - (k - 1) * p0) / k
            dp = order * (x * p1 - p0) / (x * x - 1)
            step = p1 / dp
            x -= step
            if abs(step) < mpf(10) ** -40:
                break
        nodes.append(x)
        weights.append(2 / ((1 - x * x) * dp * dp))
    return nodes, weights


NODES, WEIGHTS = gauss_legendre_36()


def squared_radius(x, n, prop):
    mu = x / sqrt(n)
    r = findroot(lambda r: ncdf(r - mu) - ncdf(-r - mu) - prop, mu + normal_quantile(prop))
    return r * r


def two_sided(n, conf, prop):
    alpha = 1 - conf
    df = mpf(n - 1)
    half = mid = mpf("8.3") / 2
    points = []
    for node, weight in zip(NODES, WEIGHTS):
        for x in (mid + node * half, mid - node * half):
            points.append((weight, df * squared_radius(x, n, prop), npdf(x)))
    def g(t):
        total = mpf(0)
        for weight, scaled, density in points:
            total += weight * gammainc(df / 2, scaled * t * t / 2, inf, regularized=True) * density
        return 2 * half * total - 1 + alpha
    chi = df * (1 - 2 / (9 * df) + normal_quantile(alpha) * sqrt(2 / (9 * df))) ** 3
    guess = 1 / (normal_quantile((1 + prop) / 2) * sqrt(df * (1 + mpf(1) / n) / chi))
    root = findroot(g, (guess, guess * mpf("1.02")), solver="secant", tol=mpf(10) ** -26)
    # G depends on t only through t^2: the secant may settle on the mirror root -t.
    return 1 / abs(mp.re(root))


def main():
    # Optional arguments: the sample sizes to do and an output file (for running parts in
    # parallel and concatenating the rows).
    sizes = [int(a) for a in sys.argv[2:]] if len(sys.argv) > 2 else SIZES
    path = sys.argv[1] if len(sys.argv) > 1 else "tests/data/tolerance_normal_kfactors.csv"
    out = open(path, "w")
    out.write("# Normal tolerance K-factors, mpmath at 32 digits, printed to 25 "
              "(tests/gen/tolerance_normal_reference.py):\n")
    out.write("# one-sided from the noncentral t; two-sided from the 36-point definition on [0, 8.3]\n")
    out.write("n,confidence,proportion,one_sided,two_sided\n")
    for n in sizes:
        for conf in LEVELS:
            for prop in LEVELS:
                c, p = mpf(conf), mpf(prop)
                out.write("%d,%s,%s,%s,%s\n" % (n, conf, prop, nstr(one_sided(n, c, p), 25),
                                                nstr(two_sided(n, c, p), 25)))
                out.flush()


main()
