/* A tiny host program: the stem-and-leaf call sequence through the installed library. */
#include <stdio.h>

#include <kelstat.h>

int main(void) {
    const double data[] = {-23, -15, -8, -2, 0, 3, 7, 12, 18, 25, 31, 44};
    const uint32_t n = (uint32_t)(sizeof data / sizeof data[0]);
    kel_StemAndLeafScaleInfo scale = {0};
    kel_StemAndLeaf* display;
    int32_t code;
    uint32_t i;

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
        printf("%4d %s%d |", (int)line->depth, (line->stem == 0 && !line->isPositive) ? "-" : "",
               (int)line->stem);
        for (j = 0; j < line->leafCount; ++j) printf("%d", (int)line->leaves[j]);
        printf("\n");
    }
    kel_DeleteStemAndLeafContainer(&display);
    return display == NULL && n == 12 ? 0 : 1;
}
