/*
 * kelstat: statistical computations behind a plain C interface.
 *
 * Two services:
 *   - stem-and-leaf displays: kel_FindStemAndLeafScaleInfo, kel_CreateStemAndLeafContainer,
 *     kel_RunStemAndLeaf, kel_DeleteStemAndLeafContainer;
 *   - tolerance intervals: kel_CalcParametricToleranceInterval,
 *     kel_CalcNonParametricToleranceInterval.
 *
 * General contract
 *   - Every call is complete in itself: no initialisation, no shutdown, no global state. The
 *     library starts no threads, takes no locks and performs no I/O.
 *   - Calls on different records may run concurrently in different threads. One stem-and-leaf
 *     container must not be used from two threads at once.
 *   - Caller arrays are read only and never kept. Records passed by pointer belong to the caller,
 *     except the stem-and-leaf container, which belongs to the library until deleted.
 *   - A numerical result that cannot be computed is a quiet NaN.
 *   - Layouts of all records are fixed (natural alignment, little-endian, 8-byte pointers) and
 *     asserted at compile time by the library's tests.
 */
#ifndef KELSTAT_H
#define KELSTAT_H

#include <stdint.h>

#define KELSTAT_VERSION_MAJOR 1
#define KELSTAT_VERSION_MINOR 0
#define KELSTAT_VERSION_PATCH 0
#define KELSTAT_VERSION_STRING "1.0.0"

#if defined(_WIN32)
#if defined(KELSTAT_BUILDING_LIBRARY)
#define KELSTAT_API __declspec(dllexport)
#else
#define KELSTAT_API __declspec(dllimport)
#endif
#elif defined(__GNUC__)
#define KELSTAT_API __attribute__((visibility("default")))
#else
#define KELSTAT_API
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* ---------------------------------------------------------------------------------------------
 * Result codes of the stem-and-leaf family.
 * ------------------------------------------------------------------------------------------- */

/** Success. */
#define KEL_OK 0
/** Invalid input (see the stem-and-leaf contract below). */
#define KEL_STEMLEAF_INVALID_INPUT 300001
/** A value lies 2 147 000 000 leaf units or more from zero. */
#define KEL_STEMLEAF_VALUE_TOO_LARGE 300002
/** Most lines a display may have; a run that would need more is refused with 300001. */
#define KEL_STEMLEAF_MAX_LINES 10000000

/* ---------------------------------------------------------------------------------------------
 * Stem-and-leaf scale (56 bytes, caller-owned).
 * ------------------------------------------------------------------------------------------- */
typedef struct kel_StemAndLeafScaleInfo {
    double leafUnit;      /* out: value of one leaf digit, a power of ten               */
    double leavesPerLine; /* out: line width in leaf units: 1, 2, 5 or 10                */
    int32_t lineCount;    /* out: number of lines of the display                         */
    /* 4 bytes of padding: never read or written */
    double lowValue;  /* out: smallest value used for scaling                         */
    double highValue; /* out: largest value used for scaling (raised if degenerate)   */
    double increment; /* in/out: > 0 selects the increment mode; written back enlarged */
    uint8_t trimOutliers; /* in: nonzero sets hinge-rule outliers aside (n >= 3)       */
    /* 7 bytes of padding: never read or written */
} kel_StemAndLeafScaleInfo;

/* One line of a display (24 bytes, library-owned). */
typedef struct kel_StemAndLeafLine {
    int32_t depth;      /* depth from the nearer end; the median line: its own leaf count */
    int32_t stem;       /* base in leaf units / 10, truncated toward zero                */
    uint8_t isPositive; /* 1 non-negative side, 0 negative side (stem 0 + 0 is "-0")     */
    /* 3 bytes of padding */
    int32_t leafCount; /* number of leaves                                              */
    int32_t* leaves;   /* leaf digits 0..9 in value order; NULL when the line is empty  */
} kel_StemAndLeafLine;

/* The display container (64 bytes, library-owned). */
typedef struct kel_StemAndLeaf {
    uint32_t lineCount;         /* entries in lines                                     */
    kel_StemAndLeafLine* lines; /* lines in ascending order of value                    */
    int32_t lowOutlierCount;    /* entries in lowOutliers                               */
    int32_t* lowOutliers;       /* ascending, in leaf units; NULL when none             */
    int32_t highOutlierCount;   /* entries in highOutliers                              */
    int32_t* highOutliers;      /* ascending, in leaf units; NULL when none             */
    double leafUnit;            /* leaf unit of the display                             */
    int32_t medianLine;         /* index of the median line, -1 when between two lines  */
    uint8_t isComplete;         /* 1 once a run has completed                           */
} kel_StemAndLeaf;

/*
 * Stem-and-leaf call sequence: fill `increment` and `trimOutliers` of a scale record, call
 * kel_FindStemAndLeafScaleInfo, create a container, call kel_RunStemAndLeaf with the same column
 * and scale record, read the container, delete it. The column is n doubles sorted ascending; the
 * library never sorts, copies or modifies it, and keeps no pointer to it.
 *
 * Bad input is refused with KEL_STEMLEAF_INVALID_INPUT (300001) and nothing is written:
 *   - a null data, scale-record or container pointer;
 *   - n = 0, or n above 2 147 483 647 (positions in a display are 32-bit);
 *   - a column holding NaN, or not sorted ascending (ties are fine; -0.0 and +0.0 are equal);
 *   - kel_RunStemAndLeaf only: a scale record whose leafUnit is not finite and positive, or whose
 *     leavesPerLine is not 1, 2, 5 or 10;
 *   - kel_RunStemAndLeaf only: a container that already holds a display (isComplete set, or lines
 *     or outlier arrays attached); its content stays intact.
 * Infinite values are not refused: they saturate like any value 2 147 000 000 leaf units or more
 * from zero (see kel_RunStemAndLeaf), and no call on them hangs.
 *
 * Thread safety: no shared state; calls on different records and containers may run concurrently.
 * One container must not be run, read and deleted from two threads at once.
 */

/**
 * Chooses the scale of a stem-and-leaf display of the sorted column data[0..n-1].
 *
 * The caller fills scale->increment and scale->trimOutliers.
 *   - increment > 0 (increment mode): the line width is the smallest 1, 2, 5 or 10 times a power
 *     of ten not below 0.99999 x increment; while the retained data span more than 48 such widths
 *     the increment is enlarged by 1.1 and the choice repeated. The enlarged increment is written
 *     back.
 *   - increment <= 0 or NaN (automatic mode): the narrowest such width giving at most
 *     round(10 log10 n) lines, held to 3..18, is chosen; increment is left as it was.
 *   - trimOutliers nonzero and n >= 3: values beyond Tukey's fences (1.5 hinge spreads outside
 *     the hinges) do not enter the scale.
 * Extremes closer than 0.01 % plus 1e-9 count as one value: highValue is then raised to
 * 1 + low + 0.0001 |low| and a single width is chosen.
 *
 * On success writes leafUnit (an exact power of ten), leavesPerLine, lineCount, lowValue,
 * highValue and increment, and returns KEL_OK. Quotients of 2 147 000 000 leaf units or more
 * saturate; the scale returned then makes kel_RunStemAndLeaf answer 300002 (lineCount may be
 * negative, having wrapped in 32 bits). Returns 300001 on bad input (above), writing nothing.
 */
KELSTAT_API int32_t kel_FindStemAndLeafScaleInfo(const double* data, uint32_t n,
                                                 kel_StemAndLeafScaleInfo* scale);

/**
 * Allocates an empty container: medianLine -1, every other field zero or NULL. The container and
 * everything later attached to it belong to the library; release them only with
 * kel_DeleteStemAndLeafContainer. Memory exhaustion is not turned into a code.
 */
KELSTAT_API kel_StemAndLeaf* kel_CreateStemAndLeafContainer(void);

/**
 * Builds the display of the sorted column data[0..n-1] at the scale of *scale (leafUnit,
 * leavesPerLine, increment and trimOutliers are read) into a container fresh from
 * kel_CreateStemAndLeafContainer. One container serves one run.
 *
 * On KEL_OK the container holds the lines (ascending, a -0 line before the +0 line when the data
 * reach both sides of zero), their leaves and depths, the median line (-1 when the median falls
 * between two lines), the outliers in leaf units, and isComplete = 1. A line is one leaf unit
 * times leavesPerLine wide, or one stem wide when every retained leaf would be 0 and no
 * increment was requested.
 *
 * Results:
 *   KEL_OK (0)                         success;
 *   KEL_STEMLEAF_VALUE_TOO_LARGE (300002) a value lies 2 147 000 000 leaf units or more from zero
 *                                      (infinite values included): only leafUnit is written;
 *   KEL_STEMLEAF_INVALID_INPUT (300001) bad input (see above): nothing is written; or the display
 *                                      would have more than KEL_STEMLEAF_MAX_LINES lines: only
 *                                      leafUnit is written, nothing is attached.
 */
KELSTAT_API int32_t kel_RunStemAndLeaf(const double* data, uint32_t n,
                                       const kel_StemAndLeafScaleInfo* scale,
                                       kel_StemAndLeaf* container);

/**
 * Releases a container and every array attached to it, then sets *container to NULL. A NULL
 * address, or the address of a NULL pointer, does nothing.
 */
KELSTAT_API void kel_DeleteStemAndLeafContainer(kel_StemAndLeaf** container);

/* ---------------------------------------------------------------------------------------------
 * Tolerance intervals.
 *
 * A tolerance interval contains, with confidence confidenceLevel, at least the fraction
 * proportion of the population the sample came from. Two-sided requests give both limits;
 * one-sided requests give a lower or an upper tolerance bound.
 *
 * Units: confidenceLevel and proportion are fractions (0.95, not 95); the nonparametric
 * achievedConfidence is in percent (0 to 100).
 *
 * Neither function validates its inputs beyond what is written below: a confidence level or
 * proportion outside (0, 1) reaches the distribution functions unchanged and normally yields NaN
 * results. Results that cannot be computed are quiet NaN (0x7FF8000000000000); a NaN result is
 * never turned into an error code.
 *
 * Thread safety: every call works on its own copy of the data; calls on different records may
 * run concurrently. Nothing is kept between calls. No exception is caught: memory exhaustion
 * passes to the caller.
 * ------------------------------------------------------------------------------------------- */

/** Which limits are wanted (signed 32-bit). Any other value gives NaN K-factors and limits from
 *  the parametric function (estimates are still set). */
typedef int32_t kel_ConfidenceType;
#define kel_LowerBound ((kel_ConfidenceType)-1) /* lower tolerance bound only */
#define kel_TwoSided ((kel_ConfidenceType)0)    /* both limits                */
#define kel_UpperBound ((kel_ConfidenceType)1)  /* upper tolerance bound only */

/** Distribution codes of kel_ParametricTIData.distribution. The field is compared as unsigned,
 *  so every value above 8 (also one a caller thinks of as negative) selects the normal model. */
enum {
    KEL_DIST_NORMAL = 0,
    KEL_DIST_LOGNORMAL = 1,
    KEL_DIST_GAMMA = 2,
    KEL_DIST_WEIBULL = 3,
    KEL_DIST_SMALLEST_EXTREME_VALUE = 4,
    KEL_DIST_LARGEST_EXTREME_VALUE = 5,
    KEL_DIST_EXPONENTIAL = 6,
    KEL_DIST_LOGLOGISTIC = 7,
    KEL_DIST_LOGISTIC = 8
};

/* Record of kel_CalcParametricToleranceInterval (88 bytes, caller-owned). */
typedef struct kel_ParametricTIData {
    uint32_t distribution;             /* in: distribution code                       */
    kel_ConfidenceType confidenceType; /* in: limits wanted                           */
    double confidenceLevel;            /* in: e.g. 0.95                               */
    double proportion;                 /* in: e.g. 0.95                               */
    double location;                   /* out: location estimate                      */
    double scale;                      /* out: scale estimate                         */
    double lowerLimit;                 /* out                                         */
    double upperLimit;                 /* out                                         */
    double lowerKFactor;               /* out                                         */
    double upperKFactor;               /* out                                         */
    double auxiliary[2];               /* out: exponential two-sided only, else NaN   */
} kel_ParametricTIData;

/* Record of kel_CalcNonParametricToleranceInterval (48 bytes, caller-owned). */
typedef struct kel_NonParametricTIData {
    kel_ConfidenceType confidenceType; /* in: limits wanted                           */
    /* 4-byte gap: never read or written */
    double confidenceLevel;    /* in                                                  */
    double proportion;         /* in                                                  */
    double lowerLimit;         /* out: an order statistic                             */
    double upperLimit;         /* out: an order statistic                             */
    double achievedConfidence; /* out: percent                                        */
} kel_NonParametricTIData;

/**
 * Tolerance interval or bound for data[0..count-1] under the model tiData->distribution.
 *
 * The caller fills distribution, confidenceType, confidenceLevel and proportion. The library
 * copies the observations, estimates the model's parameters, computes the K-factor(s) and forms
 * the limits location -/+ K x scale on the model's scale, mapped back to the data's scale:
 *   normal (0, and every code above 8): location = sample mean, scale = standard deviation
 *       (divisor n - 1). One-sided K from the noncentral t quantile; two-sided K the exact
 *       factor (coverage confidence integrated by 36-point Gauss-Legendre quadrature over
 *       [0, 8.3] standard errors, solved for K);
 *   lognormal (1): the normal model on natural logarithms, limits exponentiated; location and
 *       scale are the mean and standard deviation of the logarithms. Observations <= 0 are not
 *       screened (their logarithms, -inf or NaN, flow into the results);
 *   gamma (2): the normal model on cube roots (Wilson-Hilferty), limits cubed; location = the
 *       maximum-likelihood gamma shape, scale = the gamma scale; both NaN when every observation
 *       is equal. The code is that of the gamma fit (below);
 *   3 to 8 (Weibull, smallest and largest extreme value, exponential, log-logistic, logistic):
 *       each family's own model; a family this build does not provide writes every output NaN
 *       and returns 0.
 *
 * Written, whatever the code: location, scale, lowerLimit, upperLimit, lowerKFactor,
 * upperKFactor, auxiliary[0..1]. For a one-sided request both limit fields hold the one bound
 * asked for, and the other K-factor is NaN; for a confidenceType outside -1..1 both K-factors and
 * both limits are NaN and the estimates are still set. auxiliary holds the exponential model's
 * two scale-ratio bounds of a two-sided request and is NaN otherwise. With fewer than two
 * observations, K-factors and limits are NaN (and with none, the estimates as well).
 *
 * Returns 0, or for a model that fits its parameters by maximum likelihood (gamma, and the
 * extreme-value and logistic families) the code of that fit, passed on unchanged:
 *   1 fewer than two observations, 2 a non-finite observation or one outside the distribution's
 *   support (for the gamma: not positive), 3 all observations equal, 4 no convergence,
 *   5 invalid argument.
 * A non-zero code does not stop the computation: K-factors and limits are still formed and
 * written; the caller decides what the code means.
 *
 * A NULL tiData returns 0 and writes nothing. A NULL data pointer is treated as count = 0.
 */
KELSTAT_API int32_t kel_CalcParametricToleranceInterval(const double* data, uint32_t count,
                                                        kel_ParametricTIData* tiData);

/**
 * Distribution-free tolerance interval or bound from order statistics of data[0..count-1],
 * which the caller sorts ascending (the library never sorts; on unsorted data the elements at the
 * chosen positions are returned).
 *
 * The caller fills confidenceType, confidenceLevel and proportion; the 4-byte gap at offset 4 is
 * neither read nor written. Two order statistics X(r) <= X(s) are chosen, the indices found from
 * the incomplete beta function:
 *   kel_TwoSided: (X(r), X(s)) covers at least the proportion with at least the confidence
 *       when the sample is large enough; otherwise the widest interval, (minimum, maximum);
 *   any other value (one-sided): lowerLimit = X(r) is the lower bound and upperLimit = X(n+1-r)
 *       the matching upper bound at the same confidence; the caller reads the one it wants.
 * achievedConfidence is the confidence (percent) that the chosen order statistics actually reach,
 * usually above the request, and far below it when the sample is too small for the request.
 *
 * Writes lowerLimit, upperLimit and achievedConfidence and returns 0. With count < 2 (or above
 * 2 147 000 000) all three are NaN. A confidence level of exactly 0 (one-sided) gives NaN limits.
 *
 * A NULL tiData returns 0 and writes nothing. A NULL data pointer is treated as count = 0.
 */
KELSTAT_API int32_t kel_CalcNonParametricToleranceInterval(const double* data, uint32_t count,
                                                           kel_NonParametricTIData* tiData);

#ifdef __cplusplus
}
#endif

#endif /* KELSTAT_H */
