// The matrix library's two diagnostic outputs: a trace file of labelled integers and the text
// form of a vector of doubles. Nothing in the library's services calls either.
#ifndef KELSTAT_MATRIX_MATRIX_TRACE_H
#define KELSTAT_MATRIX_MATRIX_TRACE_H

#include <iosfwd>
#include <string>
#include <vector>

namespace vek {

// Appends the line "<label> : <value>" to "trace.txt" in the working directory and flushes it.
// The first call of the process opens (and truncates) the file, once, also under concurrent first
// calls; the file stays open until the process exits. When it cannot be opened, every trace is
// silently dropped. Concurrent calls may interleave their lines.
void matrix_trace(const std::string& label, int value);

namespace matrix_library {

// Writes "[", every element followed by ", " (the last one too), then "]", in the stream's
// current number format: {1, 2, 3} prints as "[1, 2, 3, ]", an empty vector as "[]".
std::ostream& operator<<(std::ostream& out, const std::vector<double>& values);

}  // namespace matrix_library

}  // namespace vek

#endif  // KELSTAT_MATRIX_MATRIX_TRACE_H
