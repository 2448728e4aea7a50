// The matrix library's internal assertions: a failed check throws AllegeException.
#ifndef KELSTAT_MATRIX_ALLEGE_H
#define KELSTAT_MATRIX_ALLEGE_H

#include <stdexcept>
#include <string>

namespace vek::allege {

// Thrown when a check of the matrix library fails; the message names the condition and the place
// of the check.
class AllegeException : public std::runtime_error {
  public:
    explicit AllegeException(const std::string& message) : std::runtime_error(message) {}
};

// Throws AllegeException with "assertion failed: (<condition>) <file>: <line>".
[[noreturn]] void AllegeFailure(const std::string& condition, const std::string& file, int line);

// One check of the library: the condition text and the place it reports. The places are fixed
// texts of the library's messages, so they stay stable when the code around them moves.
struct CheckSite {
    const char* condition;
    const char* file;
    int line;
};

// Throws through AllegeFailure unless the condition holds.
inline void allegeThat(bool holds, const CheckSite& site) {
    if (!holds) AllegeFailure(site.condition, site.file, site.line);
}

}  // namespace vek::allege

#endif  // KELSTAT_MATRIX_ALLEGE_H
