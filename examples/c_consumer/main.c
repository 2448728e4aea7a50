/* A tiny host program: the stem-and-leaf call sequence through the installed library, printing
 * the display of twelve values and checking the result codes on the way. */
#include <stdio.h>

#include <kelstat.h>

int main(void) {
    const double data[] = {-23, -15, -8, -2, 0, 3, 7, 12, 18, 25, 31, 44};
    const uint32_t n = (uint32_t)(sizeof data / sizeof data[0]);
    const double unsorted[] = {3, 1, 2};
    kel_StemAndLeafScaleInfo scale = {0};
    kel_StemAndLeaf* display;
    int32_t code;
    uint32_t i;
    int ok;

    code = kel_FindStemAndLeafScaleInfo(data, n, &scale);
    if (code != KEL_OK) return 1;
    display = kel_CreateStemAndLeafContainer();
    if (display == NULL) return 1;
    code = kel_RunStemAndLeaf(data, n, &scale, display);
    if (code != KEL_OK) {
        kel_DeleteStemAndLeafContainer(&display);
        return 1;
    }
    printf("leaf unit %g, %u lines\n", display->leafUnit, display->lineCount);
    for (i = 0; i < display->lineCount; ++i) {
        const kel_StemAndLeafLine* line = &display->lines[i];
        int32_t j;
        if ((int32_t)i == display->medianLine) {
            printf("%4s", "");
            printf("(%d)", (int)line->leafCount);
        } else {
            printf("%7d", (int)line->depth);
        }
        printf(" %s%d |", (line->stem == 0 && !line->isPositive) ? "-" : "", (int)line->stem);
        for (j = 0; j < line->leafCount; ++j) printf("%d", (int)line->leaves[j]);
        printf("\n");
    }
    ok = display->lineCount == 8 && display->medianLine == 3 && display->isComplete == 1;

    /* A second run on a filled container, and unsorted data, are refused. */
    ok = ok && kel_RunStemAndLeaf(data, n, &scale, display) == KEL_STEMLEAF_INVALID_INPUT;
    ok = ok && kel_FindStemAndLeafScaleInfo(unsorted, 3, &scale) == KEL_STEMLEAF_INVALID_INPUT;

    kel_DeleteStemAndLeafContainer(&display);
    kel_DeleteStemAndLeafContainer(&display); /* already NULL: nothing happens */
    return ok && display == NULL ? 0 : 1;
}
