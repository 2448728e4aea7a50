#include "specfun/polygamma.h"

namespace kelstat {

// Placeholder until the series and the asymptotic expansion are in place.
void XDPSIFN(double x, int n, int kode, int m, double* ans, int* nz, int* ierr) {
    (void)x;
    (void)n;
    (void)kode;
    for (int k = 0; k < m; ++k) ans[k] = 0.0;
    *nz = 0;
    *ierr = 1;
}

double psi(double x) {
    double ans = 0.0;
    int underflowCount = 0;
    int errorFlag = 0;
    XDPSIFN(x, 0, 1, 1, &ans, &underflowCount, &errorFlag);
    return -ans;
}

}  // namespace kelstat
