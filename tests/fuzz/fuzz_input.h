// Turns a fuzzer's byte string into the arguments of a library call. Values are drawn through a
// tag byte so that the fuzzer reaches the awkward doubles (NaN, infinities, signed zeros,
// subnormals, values at the stem-and-leaf saturation limit) without having to guess their bit
// patterns; raw 8-byte doubles stay reachable through one of the tags.
#ifndef KELSTAT_TESTS_FUZZ_FUZZ_INPUT_H
#define KELSTAT_TESTS_FUZZ_FUZZ_INPUT_H

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>

namespace kelstat_fuzz {

// The sentinel the targets put into every output field before a call: a signalling NaN with a
// payload no computation produces, so a field left unwritten is recognised bit for bit.
constexpr std::uint64_t kUnwrittenBits = 0x7FF4DEADBEEF0001ULL;

inline double unwrittenValue() {
    double value;
    std::memcpy(&value, &kUnwrittenBits, sizeof value);
    return value;
}

inline bool isUnwritten(double value) {
    std::uint64_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    return bits == kUnwrittenBits;
}

inline bool sameBits(double a, double b) {
    return std::memcmp(&a, &b, sizeof a) == 0;
}

class FuzzInput {
  public:
    FuzzInput(const std::uint8_t* data, std::size_t size) : data_(data), size_(size) {}

    std::size_t remaining() const { return size_ - position_; }

    // Past the end every read gives zeros, so short inputs are still whole calls.
    std::uint8_t byte() { return position_ < size_ ? data_[position_++] : 0; }

    std::uint16_t u16() {
        const std::uint16_t low = byte();
        return static_cast<std::uint16_t>(low | (std::uint16_t{byte()} << 8));
    }

    std::uint32_t u32() {
        const std::uint32_t low = u16();
        return low | (std::uint32_t{u16()} << 16);
    }

    double rawDouble() {
        std::uint64_t bits = 0;
        for (int i = 0; i < 8; ++i) bits |= std::uint64_t{byte()} << (8 * i);
        double value;
        std::memcpy(&value, &bits, sizeof value);
        return value;
    }

    // A data value. Most tags give ordinary numbers of a few digits at several magnitudes, so
    // that real displays and fits come out; the rest give the hostile ones.
    double value() {
        const std::uint8_t tag = byte();
        switch (tag) {
            case 0:
                return std::numeric_limits<double>::quiet_NaN();
            case 1:
                return std::numeric_limits<double>::infinity();
            case 2:
                return -std::numeric_limits<double>::infinity();
            case 3:
                return 0.0;
            case 4:
                return -0.0;
            case 5:
                return std::numeric_limits<double>::denorm_min();
            case 6:
                return -std::numeric_limits<double>::denorm_min();
            case 7:
                return std::numeric_limits<double>::min();
            case 8:
                return std::numeric_limits<double>::max();
            case 9:
                return -std::numeric_limits<double>::max();
            case 10:
                return 2147000000.0;  // the stem-and-leaf saturation limit in leaf units
            case 11:
                return -2147000000.0;
            case 12:
                return 2146999999.0;
            case 13:
                return 2147483647.0;
            case 14:
                return std::numeric_limits<double>::epsilon();
            case 15:
                return rawDouble();
            default:
                break;
        }
        // An integer of up to five digits times a power of ten from 1e-8 to 1e7.
        const double digits = static_cast<double>(static_cast<std::int16_t>(u16()));
        const int exponent = static_cast<int>(tag % 16) - 8;
        return digits * std::pow(10.0, exponent);
    }

    // A confidence level or proportion: mostly the usual ones, then the edges and nonsense.
    double level() {
        const std::uint8_t tag = byte();
        switch (tag % 24) {
            case 0:
                return 0.0;
            case 1:
                return 1.0;
            case 2:
                return -0.5;
            case 3:
                return std::numeric_limits<double>::quiet_NaN();
            case 4:
                return std::numeric_limits<double>::infinity();
            case 5:
                return -std::numeric_limits<double>::infinity();
            case 6:
                return 1.5;
            case 7:
                return std::numeric_limits<double>::denorm_min();
            case 8:
                return 1.0 - std::numeric_limits<double>::epsilon() / 2;
            case 9:
                return rawDouble();
            case 10:
                return 0.5;
            case 11:
                return 0.999999;
            case 12:
                return 1e-9;
            case 13:
                return -0.0;
            case 14:
                return 0.9;
            case 15:
                return 0.99;
            default:
                break;
        }
        // Anything in (0, 1) on a grid of 1/65536, and 0.95 for the rest of the tags.
        if (tag % 24 < 20) return (u16() + 0.5) / 65536.0;
        return 0.95;
    }

  private:
    const std::uint8_t* data_;
    std::size_t size_;
    std::size_t position_ = 0;
};

// A column of count values: either every value read through value(), or, so that a few bytes
// can stand for thousands of observations, a generated sample (location + scale x a uniform,
// exponential or heavy-tailed variate) with an optional hostile value planted in it.
template <class Column>
void fillColumn(FuzzInput& input, std::size_t count, Column& column) {
    column.resize(count);
    const std::uint8_t mode = input.byte();
    if (mode % 4 == 0) {
        for (auto& x : column) x = input.value();
        return;
    }
    const double location = input.value();
    const double scale = input.value();
    std::uint64_t state = input.u32() | 1u;
    for (auto& x : column) {
        state = state * 6364136223846793005ULL + 1442695040888963407ULL;
        const double uniform = (static_cast<double>(state >> 11) + 0.5) / 9007199254740992.0;
        double variate = uniform;
        if (mode % 4 == 2) variate = -std::log(uniform);
        if (mode % 4 == 3) variate = 1.0 / uniform - 1.0;
        x = location + scale * variate;
    }
    if (mode & 4) {
        const std::size_t where = input.u16();
        if (count > 0) column[where % count] = input.value();
    }
}

// A failed invariant: report it and stop the way the fuzzer and the replay driver both notice.
[[noreturn]] inline void fail(const char* what) {
    std::fprintf(stderr, "invariant failed: %s\n", what);
    std::abort();
}

#define KELSTAT_FUZZ_CHECK(condition)                       \
    do {                                                    \
        if (!(condition)) ::kelstat_fuzz::fail(#condition); \
    } while (false)

}  // namespace kelstat_fuzz

#endif  // KELSTAT_TESTS_FUZZ_FUZZ_INPUT_H
