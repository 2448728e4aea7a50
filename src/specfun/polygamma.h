// Scaled derivatives of the digamma function and the digamma function itself.
#ifndef KELSTAT_SPECFUN_POLYGAMMA_H
#define KELSTAT_SPECFUN_POLYGAMMA_H

namespace kelstat {

// Scaled polygamma functions of a positive argument.
//
// For x > 0 fills ans[0..m-1] with the m members of the sequence that starts at order n:
//   kode = 1:  ans[k] = (-1)^(n+k+1) / (n+k)! * psi^(n+k)(x),     k = 0..m-1,
//   kode = 2:  as kode = 1, except that ans[0] = -psi(x) + ln(x) when n = 0,
// where psi^(j) is the j-th derivative of the digamma function (psi^(0) = psi).
// So with n = 0, kode = 1, m = 1, ans[0] = -psi(x).
//
// ierr = 0: computed; nz > 0 then says that the last nz members underflowed and were set to 0.
//           Departure from the published routine: the member -psi(x) (n = 0) is always
//           computed, where Amos's exponent tests would report it underflowed for x > ~1e152.
// ierr = 1: bad argument (x <= 0, n < 0, kode not 1 or 2, m < 1); ans is not written, except
//           that a NaN x sets all m members to NaN.
// ierr = 2: overflow, x too small for the order n + m - 1; nz = 0.
// ierr = 3: orders too high for the downward recurrence (more than 100 steps); nz = 0. With
//           IEEE double constants such orders always underflow first, so this cannot occur.
// Accuracy: a few units of double rounding where the result is representable.
// Source: D. E. Amos, "A portable Fortran subroutine for derivatives of the psi function",
// ACM TOMS 9 (1983) 494-502, Algorithm 610 (DPSIFN): asymptotic expansion from a fitted
// threshold, downward recurrence, or a direct series for high orders.
void XDPSIFN(double x, int n, int kode, int m, double* ans, int* nz, int* ierr);

// Digamma function psi(x) = d/dx ln Gamma(x) for x > 0, taken as -ans[0] of
// XDPSIFN(x, 0, 1, 1, ...), whose flags are not examined: 0 for x <= 0, NaN for NaN, +inf for
// +inf.
// Accuracy: about 4e-16 relative, and 5e-17 absolute next to the positive root 1.4616...
// where the value passes through 0.
double psi(double x);

}  // namespace kelstat

#endif  // KELSTAT_SPECFUN_POLYGAMMA_H
