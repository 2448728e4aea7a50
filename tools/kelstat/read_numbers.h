// Reading a column of numbers from a text file or standard input, shared by the subcommands.
#ifndef KELSTAT_TOOLS_READ_NUMBERS_H
#define KELSTAT_TOOLS_READ_NUMBERS_H

#include <istream>
#include <string>
#include <vector>

namespace kelstat::cli {

// Appends the numbers of the text to values. Numbers are separated by white space, commas or
// new lines. A token that is not a finite number stops the reading: false, with a message naming
// the token, its line and column, and its place among the tokens. sourceName names the input in
// messages.
bool readNumbers(std::istream& in, const std::string& sourceName, std::vector<double>& values,
                 std::string& error);

// The same from the file at path, or from standard input when path is empty or "-".
bool readNumbersFromPath(const std::string& path, std::vector<double>& values, std::string& error);

}  // namespace kelstat::cli

#endif  // KELSTAT_TOOLS_READ_NUMBERS_H
