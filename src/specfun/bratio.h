// Incomplete beta function ratio I_x(a, b) and the auxiliary functions that other special
// functions share with it.
#ifndef KELSTAT_SPECFUN_BRATIO_H
#define KELSTAT_SPECFUN_BRATIO_H

namespace kelstat {

// Computes w = I_x(a, b) and w1 = 1 - I_x(a, b), each to full relative precision, for a >= 0,
// b >= 0 (not both 0), 0 <= x <= 1 and y = 1 - x supplied by the caller, so that the complement
// keeps its digits when x is near 1.
//
// Both outputs are set to 0 on entry and stay 0 when *ierr is not 0. The argument checks, in the
// order they are made:
//   1  a < 0 or b < 0             2  a = b = 0
//   3  x outside [0, 1]           4  y outside [0, 1]
//   5  |x + y - 1| > 3 * 2^-52    6  x = a = 0
//   7  y = b = 0
// x = 0 or b = 0 gives w = 0, w1 = 1; y = 0 or a = 0 gives w = 1, w1 = 0; a and b both below
// 1e-18 give w = b/(a + b), w1 = a/(a + b). Otherwise a NaN argument passes the checks (ierr 0)
// and gives w = w1 = NaN.
//
// Accuracy: 1e-13 relative for both outputs, or 2^-51 times the value's condition number in its
// inputs where that is larger (very large a and b away from the mean, far tails), down to values
// near 1e-290. A shape below 1e-15 against x or y below about 1e-90 loses a little more, about
// (tiny shape) * |ln min(x, y)| / 2: the published series for that case is of first order in the
// tiny shape.
//
// Method: DiDonato & Morris, "Significant digit computation of the incomplete beta function
// ratios", ACM TOMS 18 (1992) 360-373, Algorithm 708, with the IEEE double machine constants.
// Departures: ln Gamma for arguments below 10 comes from the C runtime's tgamma, and the digamma
// function from Amos's XDPSIFN (ACM TOMS Algorithm 610).
void BRATIO(double a, double b, double x, double y, double* w, double* w1, int* ierr);

// The auxiliary functions below are those of Algorithm 708, shared with the incomplete gamma
// ratio and exposed for tests.

// Machine constants, fixed to IEEE double: 1 (or below) the precision 2^-52, 2 the smallest
// normal number, 3 (or above) the largest finite number.
double spmpar(int which);

// Largest argument whose exponential is finite (l = 0), or the most negative argument whose
// exponential is a normal number (any other l), each scaled by 0.99999.
double exparg(int l);

// Integer machine constants 1..10 (integer base and digits, largest int, floating base, single
// and double precision digits and exponent range); 0 for any other index.
int ipmpar(int index);

// erf(x), by the rational approximations of Algorithm 708.
double errorFunction(double x);

// erfc(x) when ind = 0; exp(x^2) * erfc(x) otherwise.
double erfc1(int ind, double x);

// 1/Gamma(a + 1) - 1 for -0.5 <= a <= 1.5.
double gam1(double a);

// exp(x) - 1, accurate near 0.
double rexp(double x);

// ln Gamma(a) for a > 0 (tgamma below 10, the Stirling series from 10 on).
double gamln(double a);

// ln B(a0, b0) for a0, b0 > 0.
double betaln(double a0, double b0);

}  // namespace kelstat

#endif  // KELSTAT_SPECFUN_BRATIO_H
