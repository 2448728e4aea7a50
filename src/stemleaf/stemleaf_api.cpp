// The four exported stem-and-leaf functions.
#include "kelstat.h"

extern "C" {

KELSTAT_API int32_t kel_FindStemAndLeafScaleInfo(const double*, uint32_t,
                                                 kel_StemAndLeafScaleInfo*) {
    return KEL_STEMLEAF_INVALID_INPUT;
}

KELSTAT_API kel_StemAndLeaf* kel_CreateStemAndLeafContainer(void) { return nullptr; }

KELSTAT_API int32_t kel_RunStemAndLeaf(const double*, uint32_t, const kel_StemAndLeafScaleInfo*,
                                       kel_StemAndLeaf*) {
    return KEL_STEMLEAF_INVALID_INPUT;
}

KELSTAT_API void kel_DeleteStemAndLeafContainer(kel_StemAndLeaf**) {}

}  // extern "C"
