#include "matrix/allege.h"

namespace vek::allege {

void AllegeFailure(const std::string& condition, const std::string& file, int line) {
    throw AllegeException("assertion failed: (" + condition + ") " + file + ": " +
                          std::to_string(line));
}

}  // namespace vek::allege
