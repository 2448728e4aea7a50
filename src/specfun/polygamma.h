// Scaled derivatives of the digamma function and the digamma function itself.
#ifndef KELSTAT_SPECFUN_POLYGAMMA_H
#define KELSTAT_SPECFUN_POLYGAMMA_H

namespace kelstat {

// Scaled polygamma functions of a positive argument.
//
// For x > 0 fills ans[0..m-1] with the m members of the sequence that starts at order n:
//   kode = 1:  ans[k] = (-1)^(n+k+1) / (n+k)! * psi^(n+k)(x),     k = 0..m-1,
//   kode = 2:  as kode = 1, with -ln(x) added to ans[0] when n = 0,
// where psi^(j) is the j-th derivative of the digamma function (psi^(0) = psi).
// So with n = 0, kode = 1, m = 1, ans[0] = -psi(x).
//
// ierr: 0 success (nz counts trailing members of ans that underflowed to 0, it is 0 or the
// number of members that were set to 0); 1 bad argument (x <= 0, n < 0, kode not 1 or 2,
// m < 1); 2 overflow (x too small, or n + m - 1 too large: nz holds the index count affected);
// 3 x too small for the requested orders; 4 n too large for double precision.
// Accuracy: about 1e-15 relative where the result is representable.
// Source: D. E. Amos, "A portable Fortran subroutine for derivatives of the psi function",
// ACM TOMS 9 (1983), Algorithm 610 (DPSIFN).
void XDPSIFN(double x, int n, int kode, int m, double* ans, int* nz, int* ierr);

// Digamma function psi(x) = d/dx ln Gamma(x) for x > 0, taken as -ans[0] of
// XDPSIFN(x, 0, 1, 1, ...). Outside x > 0 the routine reports an error and the result is 0.
// Accuracy: within a few ulps, except near the positive root 1.4616... where the relative
// error grows as the value passes through 0.
double psi(double x);

}  // namespace kelstat

#endif  // KELSTAT_SPECFUN_POLYGAMMA_H
