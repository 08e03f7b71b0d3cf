#ifndef NUMBER_TEXT_DECIMAL_DIGITS_HPP
#define NUMBER_TEXT_DECIMAL_DIGITS_HPP

// Decimal digits of integers, computed eight at a time and stored eight bytes at a time: the
// number text's digit writer.

#include <array>
#include <cstdint>
#include <cstring>
#include <limits>

namespace number_text {

// The powers of ten from 10^0 to 10^19: all that a std::uint64_t holds.
inline constexpr auto INTEGER_POWERS_OF_TEN = [] {
    std::array<std::uint64_t, std::numeric_limits<std::uint64_t>::digits10 + 1> powers{};
    std::uint64_t power = 1;
    for (auto& entry : powers) {
        entry = power;
        power *= 10;
    }
    return powers;
}();

// The number of decimal digits of `integer`, 1 for 0. The bit length of integer | 1 (the same
// count: 10^k is even) times log10(2), for which 1233/4096 is close enough below 2^64, is the
// count or one less, and one comparison tells which.
inline int decimal_digit_count(std::uint64_t integer) {
    const std::uint64_t odd = integer | 1U;
    const int bits = std::numeric_limits<std::uint64_t>::digits - __builtin_clzll(odd);
    const int guess = (bits * 1233) >> 12U;
    return guess + (odd >= INTEGER_POWERS_OF_TEN[static_cast<std::size_t>(guess)] ? 1 : 0);
}

// Digits are made side by side in the lanes of a 64-bit word, which a little-endian store
// writes lowest byte first: the first digit goes to the lowest lane. Each step divides every
// lane by a power of ten with a multiplication that stays inside the lane.

// Each 32-bit lane's number below 10^4 into two 16-bit lanes of its pairs of digits: below 10^4
// a division by 100 is (x * 10486) >> 20.
inline std::uint64_t split_pairs(std::uint64_t fours) {
    const std::uint64_t hundreds = (fours * 10'486 >> 20U) & 0x0000'007F'0000'007FU;
    return hundreds | (fours - hundreds * 100) << 16U;
}

// Each 16-bit lane's number below 100 into two bytes, as characters: below 100 a division by
// 10 is (x * 103) >> 10.
inline std::uint64_t split_singles(std::uint64_t pairs) {
    const std::uint64_t tens = (pairs * 103 >> 10U) & 0x000F'000F'000F'000FU;
    return (tens | (pairs - tens * 10) << 8U) + 0x3030'3030'3030'3030U;
}

// The eight digits of `digits` (below 10^8) as characters, leading zeros too.
inline std::uint64_t eight_digit_text(std::uint32_t digits) {
    return split_singles(split_pairs(digits / 10'000 | std::uint64_t{digits % 10'000} << 32U));
}

// Stores the last `count` (1 to 8) characters of a word of eight at `out`, then zero bytes up
// to eight.
inline void store_last(char* out, std::uint64_t text, int count) {
    static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "digit texts are little-endian");
    const std::uint64_t last = text >> (8U * static_cast<unsigned>(8 - count));
    std::memcpy(out, &last, sizeof last);
}

// Writes the last `count` (1 to 20) decimal digits of `value`, leading zeros too, and returns
// their end. The digits are computed eight at a time and stored eight bytes at a time, straight
// into place: up to seven bytes past the end are written too, which what follows overwrites or
// the terminator ends (the longest text, 24 characters, leaves room for them in 80 bytes).
inline char* write_digits(char* out, std::uint64_t value, int count) {
    constexpr std::uint64_t eight_digits = 100'000'000;
    char* const end = out + count;
    if (count <= 4) {
        // Four digits or fewer fit the lowest lane: two steps instead of three, and the
        // characters moved up to where store_last takes them.
        store_last(out, split_singles(split_pairs(value % 10'000)) << 32U, count);
        return end;
    }
    const std::uint64_t high = value / eight_digits;
    if (count > 8) {
        const std::uint64_t middle = high % eight_digits;
        if (count > 16) {
            store_last(out, eight_digit_text(static_cast<std::uint32_t>(high / eight_digits)),
                       count - 16);
            store_last(end - 16, eight_digit_text(static_cast<std::uint32_t>(middle)), 8);
        } else {
            store_last(out, eight_digit_text(static_cast<std::uint32_t>(middle)), count - 8);
        }
    }
    const auto low = static_cast<std::uint32_t>(value - high * eight_digits);
    store_last(count > 8 ? end - 8 : out, eight_digit_text(low), count > 8 ? 8 : count);
    return end;
}

} // namespace number_text

#endif
