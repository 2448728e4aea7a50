#include "matrix/matrix_eigensystem.h"

#include <cmath>
#include <cstddef>
#include <utility>

#include "matrix/matrix_check_sites.h"
#include "matrix/matrix_exceptions.h"
#include "matrix/matrix_functions.h"

namespace vek::matrix_library {

namespace {

constexpr double kMachineEpsilon = 0x1p-53;  // unit roundoff of double, tql2's machep
constexpr double kComparisonFuzz = 1e-12;    // relative fuzz of every comparison of the QL phase
constexpr double kZeroTestFuzz = 4e-12;      // fuzz of the reduction's zero tests
// tql2's bound: an eigenvalue that has not split off after this many QL sweeps will not.
constexpr int kMaxSweepsPerEigenvalue = 30;

using Vector = std::vector<double>;

int compare(double a, double b) {
    return mCompareWithFuzz(a, b, 0.0, kComparisonFuzz);
}

bool isFuzzyZero(double x) {
    return std::fabs(x) < kZeroTestFuzz * (1.0 + std::fabs(x));
}

// Values clearly below the unit roundoff are noise of the rotations: set them to zero.
void flushTiny(double& value) {
    if (compare(std::fabs(value), kMachineEpsilon) == -1) value = 0.0;
}

// Householder reflection that clears row i of z left of its subdiagonal (i >= 2). Stores the
// reflection's vector in row i and its scaled copy in column i, the new subdiagonal element in
// e[i], updates the leading i x i block, and returns the reflection's h (0 when the row is
// already zero within the fuzz).
double reflectRow(matrix<double>& z, Vector& e, int i) {
    const int l = i - 1;
    double scale = 0.0;
    for (int k = 0; k <= l; ++k) scale += std::fabs(z(i, k));
    if (isFuzzyZero(scale)) {
        e[i] = z(i, l);
        return 0.0;
    }
    double h = 0.0;
    for (int k = 0; k <= l; ++k) {
        z(i, k) /= scale;
        h += z(i, k) * z(i, k);
    }
    double f = z(i, l);
    double g = -mTransferSign(std::sqrt(h), f);
    e[i] = scale * g;
    h -= f * g;
    z(i, l) = f - g;
    // p = A u / h into e[0..l], and f = u'p.
    f = 0.0;
    for (int j = 0; j <= l; ++j) {
        z(j, i) = z(i, j) / h;
        g = 0.0;
        for (int k = 0; k <= j; ++k) g += z(j, k) * z(i, k);
        for (int k = j + 1; k <= l; ++k) g += z(k, j) * z(i, k);
        e[j] = g / h;
        f += e[j] * z(i, j);
    }
    // A - q u' - u q' with q = p - (u'p / 2h) u, lower triangle only.
    const double hh = f / (h + h);
    for (int j = 0; j <= l; ++j) {
        f = z(i, j);
        g = e[j] - hh * f;
        e[j] = g;
        for (int k = 0; k <= j; ++k) z(j, k) = z(j, k) - f * e[k] - g * z(i, k);
    }
    return h;
}

// Forms in z the product of the reflections stored by reflectRow; d[i] holds reflection i's h on
// entry and the tridiagonal matrix's diagonal on return.
void accumulateReflections(matrix<double>& z, Vector& d) {
    const int n = z.rowCount();
    for (int i = 0; i < n; ++i) {
        const int l = i - 1;
        if (i > 0 && !isFuzzyZero(d[i])) {
            for (int j = 0; j <= l; ++j) {
                double g = 0.0;
                for (int k = 0; k <= l; ++k) g += z(i, k) * z(k, j);
                for (int k = 0; k <= l; ++k) z(k, j) -= g * z(k, i);
            }
        }
        d[i] = z(i, i);
        z(i, i) = 1.0;
        for (int j = 0; j <= l; ++j) z(j, i) = z(i, j) = 0.0;
    }
}

// Householder reduction of the symmetric matrix held in the lower triangle of z to tridiagonal
// form: d receives the diagonal, e the subdiagonal in e[1..n-1], and z the orthogonal matrix of
// the accumulated transformations.
void reduceToTridiagonal(matrix<double>& z, Vector& d, Vector& e) {
    const int n = z.rowCount();
    if (n == 0) return;
    for (int i = n - 1; i >= 1; --i) {
        if (i >= 2) {
            d[i] = reflectRow(z, e, i);
        } else {
            e[i] = z(i, i - 1);
            d[i] = 0.0;
        }
    }
    d[0] = 0.0;
    e[0] = 0.0;
    accumulateReflections(z, d);
}

// State at the end of a QL sweep: the last rotation's cosine and sine and the carried value p.
struct SweepEnd {
    double cosine;
    double sine;
    double p;
};

// One QL sweep up the block l..m, the rotations applied to the columns of z as well.
SweepEnd sweep(int l, int m, Vector& d, Vector& e, matrix<double>& z) {
    const int n = z.rowCount();
    double p = d[m];
    double c = 1.0;
    double s = 0.0;
    for (int i = m - 1; i >= l; --i) {
        double g = c * e[i];
        double h = c * p;
        // The case split keeps the ratio below one in magnitude instead of calling a hypotenuse.
        if (compare(std::fabs(p), std::fabs(e[i])) == -1) {
            const double t = p / e[i];
            const double r = std::sqrt(t * t + 1.0);
            e[i + 1] = s * e[i] * r;
            s = 1.0 / r;
            c = t * s;
        } else {
            const double t = e[i] / p;
            const double r = std::sqrt(t * t + 1.0);
            e[i + 1] = s * p * r;
            s = t / r;
            c = 1.0 / r;
        }
        flushTiny(c);
        flushTiny(d[i]);
        flushTiny(s);
        flushTiny(g);
        p = c * d[i] - s * g;
        flushTiny(p);
        flushTiny(h);
        d[i + 1] = h + s * (c * g + s * d[i]);
        for (int k = 0; k < n; ++k) {
            const double t = z(k, i + 1);
            z(k, i + 1) = s * z(k, i) + c * t;
            z(k, i) = c * z(k, i) - s * t;
        }
    }
    return {c, s, p};
}

// QL iteration on the tridiagonal matrix (d, e[1..n-1]), accumulating into z. Returns 0, or
// l + 1 for the eigenvalue l that did not settle.
int diagonaliseTridiagonal(Vector& d, Vector& e, matrix<double>& z) {
    const int n = static_cast<int>(d.size());
    if (n == 0) return 0;
    for (int i = 1; i < n; ++i) e[i - 1] = e[i];
    e[n - 1] = 0.0;

    double shiftTotal = 0.0;
    double threshold = 0.0;
    for (int l = 0; l < n; ++l) {
        const double h = kMachineEpsilon * (std::fabs(d[l]) + std::fabs(e[l]));
        if (compare(threshold, h) == -1) threshold = h;
        // The first negligible subdiagonal element at or after l bounds the block.
        int m = l;
        while (m < n - 1 && compare(std::fabs(e[m]), threshold) == 1) ++m;

        if (m != l) {
            int sweeps = 0;
            do {
                if (sweeps == kMaxSweepsPerEigenvalue) return l + 1;
                const double g = d[l];
                const double p = (d[l + 1] - g) / (2.0 * e[l]);
                const double r = std::sqrt(p * p + 1.0);
                d[l] = e[l] / (p + mTransferSign(r, p));
                const double shift = g - d[l];
                for (int i = l + 1; i < n; ++i) d[i] -= shift;
                shiftTotal += shift;

                const SweepEnd end = sweep(l, m, d, e, z);
                e[l] = end.sine * end.p;
                d[l] = end.cosine * end.p;
                ++sweeps;
            } while (compare(std::fabs(e[l]), threshold) == 1);
        }
        d[l] += shiftTotal;
    }
    return 0;
}

// Selection sort of the eigenvalues, moving the eigenvectors along; among values equal within
// the fuzz the earliest stays first.
void sortAscending(Vector& d, matrix<double>& z) {
    const int n = static_cast<int>(d.size());
    for (int i = 0; i + 1 < n; ++i) {
        int smallest = i;
        for (int j = i + 1; j < n; ++j) {
            if (compare(d[j], d[smallest]) == -1) smallest = j;
        }
        if (smallest == i) continue;
        std::swap(d[i], d[smallest]);
        for (int k = 0; k < n; ++k) std::swap(z(k, i), z(k, smallest));
    }
}

}  // namespace

int mEigenSystemsIterator(const matrix<double>& a, std::vector<double>& values,
                          matrix<double>& vectors) {
    const int n = a.rowCount();
    if (a.colCount() != n) throw MatrixException("mEigenSystemsIterator: matrix must be square");
    // Work on locals so that a may be the same object as vectors.
    Vector d(static_cast<std::size_t>(n), 0.0);
    Vector e(static_cast<std::size_t>(n), 0.0);
    matrix<double> z(n, n, 0.0);
    for (int i = 0; i < n; ++i) {
        for (int j = 0; j <= i; ++j) z(i, j) = a(i, j);
    }
    reduceToTridiagonal(z, d, e);
    const int result = diagonaliseTridiagonal(d, e, z);
    if (result == 0) sortAscending(d, z);
    values.swap(d);
    vectors.swap(z);
    return result;
}

int EigenSystems(const matrix<double>& a, std::vector<double>& values, matrix<double>& vectors) {
    const int iNumRows = a.rowCount();
    allege::allegeThat(iNumRows == a.colCount(), sites::kEigenSystemsSquare);
    matrix<double> eigenvectors(iNumRows, iNumRows, 0.0);
    const int result = mEigenSystemsIterator(a, values, eigenvectors);
    vectors = eigenvectors;
    return result;
}

}  // namespace vek::matrix_library
