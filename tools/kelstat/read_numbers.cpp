#include "read_numbers.h"

#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iostream>
#include <iterator>

namespace kelstat::cli {

namespace {

bool isSeparator(char c) {
    return c == ',' || c == ' ' || c == '\t' || c == '\n' || c == '\r' || c == '\v' || c == '\f';
}

// The whole token must be a number, and a finite one: "1e999" and "nan" are refused too.
bool parseFiniteNumber(const std::string& token, double& value) {
    char* end = nullptr;
    value = std::strtod(token.c_str(), &end);
    return end == token.c_str() + token.size() && std::isfinite(value);
}

}  // namespace

bool readNumbers(std::istream& in, const std::string& sourceName, std::vector<double>& values,
                 std::string& error) {
    const std::string text{std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
    std::size_t line = 1;
    std::size_t lineStart = 0;
    std::size_t tokenNumber = 0;
    std::size_t i = 0;
    while (i < text.size()) {
        if (isSeparator(text[i])) {
            if (text[i] == '\n') {
                ++line;
                lineStart = i + 1;
            }
            ++i;
            continue;
        }
        const std::size_t start = i;
        while (i < text.size() && !isSeparator(text[i])) ++i;
        const std::string token = text.substr(start, i - start);
        ++tokenNumber;
        double value = 0;
        if (!parseFiniteNumber(token, value)) {
            error = sourceName + ":" + std::to_string(line) + ":" +
                    std::to_string(start - lineStart + 1) + ": token " +
                    std::to_string(tokenNumber) + " \"" + token + "\" is not a finite number";
            return false;
        }
        values.push_back(value);
    }
    return true;
}

bool readNumbersFromPath(const std::string& path, std::vector<double>& values, std::string& error) {
    if (path.empty() || path == "-") return readNumbers(std::cin, "<stdin>", values, error);
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        error = path + ": cannot open: " + std::strerror(errno);
        return false;
    }
    return readNumbers(file, path, values, error);
}

}  // namespace kelstat::cli
