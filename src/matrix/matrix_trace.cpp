#include "matrix/matrix_trace.h"

#include <fstream>
#include <ostream>

namespace vek {

void matrix_trace(const std::string& label, int value) {
    // The library's one piece of state and one file: a diagnostic aid, opened on first use so that
    // a process that never traces never touches the file system.
    static std::ofstream traceFile("trace.txt", std::ios::out | std::ios::trunc);
    traceFile << label << " : " << value << '\n';
    traceFile.flush();
}

namespace matrix_library {

std::ostream& operator<<(std::ostream& out, const std::vector<double>& values) {
    out << "[";
    for (const double value : values) out << value << ", ";
    out << "]";
    return out;
}

}  // namespace matrix_library

}  // namespace vek
