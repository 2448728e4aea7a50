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
/** Invalid input; nothing was written. */
#define KEL_STEMLEAF_INVALID_INPUT 300001
/** A value lies 2 147 000 000 leaf units or more from zero. */
#define KEL_STEMLEAF_VALUE_TOO_LARGE 300002

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

/**
 * Chooses the scale of a stem-and-leaf display of the sorted column data[0..n-1].
 * (Contract details: see the stem-and-leaf section of the README.)
 */
KELSTAT_API int32_t kel_FindStemAndLeafScaleInfo(const double* data, uint32_t n,
                                                 kel_StemAndLeafScaleInfo* scale);

/** Allocates an empty container (medianLine -1, everything else zero). */
KELSTAT_API kel_StemAndLeaf* kel_CreateStemAndLeafContainer(void);

/** Builds the display of data[0..n-1] at the given scale into a fresh container. */
KELSTAT_API int32_t kel_RunStemAndLeaf(const double* data, uint32_t n,
                                       const kel_StemAndLeafScaleInfo* scale,
                                       kel_StemAndLeaf* container);

/** Releases a container and everything hanging from it; sets *container to NULL. */
KELSTAT_API void kel_DeleteStemAndLeafContainer(kel_StemAndLeaf** container);

/* ---------------------------------------------------------------------------------------------
 * Tolerance intervals.
 * ------------------------------------------------------------------------------------------- */

/** Which limits are wanted (signed 32-bit). */
typedef int32_t kel_ConfidenceType;
#define kel_LowerBound ((kel_ConfidenceType)-1)
#define kel_TwoSided ((kel_ConfidenceType)0)
#define kel_UpperBound ((kel_ConfidenceType)1)

/** Distribution codes of kel_ParametricTIData.distribution; any other value selects normal. */
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

/** Tolerance interval or bound under a distribution model. */
KELSTAT_API int32_t kel_CalcParametricToleranceInterval(const double* data, uint32_t count,
                                                        kel_ParametricTIData* tiData);

/** Nonparametric tolerance interval or bound from the sorted sample. */
KELSTAT_API int32_t kel_CalcNonParametricToleranceInterval(const double* data, uint32_t count,
                                                           kel_NonParametricTIData* tiData);

#ifdef __cplusplus
}
#endif

#endif /* KELSTAT_H */
