#include "number_text.hpp"

#include "decimal_digits.hpp"

#include <dragonbox/dragonbox.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string_view>
#include <type_traits>

namespace {

using number_text::decimal_digit_count;
using number_text::INTEGER_POWERS_OF_TEN;
using number_text::write_digits;

constexpr std::size_t MAX_TEXT = 79;

// The powers of ten from 10^0 to 10^17 as doubles: each is exact (5^17 is below 2^53), and up to
// 10^10 in a float.
constexpr auto POWERS_OF_TEN = [] {
    std::array<double, std::numeric_limits<double>::max_digits10 + 1> powers{};
    for (std::size_t i = 0; i != powers.size(); ++i) {
        powers.at(i) = static_cast<double>(INTEGER_POWERS_OF_TEN.at(i));
    }
    return powers;
}();

// Whether to_chars' plain form takes scientific notation for `count` significant digits with
// the decimal point after `point` of them (before -point zeros when not positive): only when it
// is strictly shorter than fixed notation.
bool scientific_is_shorter(int count, int point) {
    const int exponent = point - 1;
    const int scientific_length =
        count + (count > 1 ? 1 : 0) + (exponent <= -100 || exponent >= 100 ? 5 : 4);
    const int fixed_length = point >= count ? point : point > 0 ? count + 1 : count + 2 - point;
    return scientific_length < fixed_length;
}

// Writes `significand` (`count` digits, no trailing zero) times 10^exponent in scientific
// notation as to_chars does: "1e+05", "1.5e-07", "1.25e+300", the exponent with at least two
// digits.
char* write_scientific(char* out, std::uint64_t significand, int count, int exponent) {
    // The digits one place to the right, then the first moved in front of the point.
    write_digits(out + 1, significand, count);
    out[0] = out[1];
    out[1] = '.';
    out += count > 1 ? count + 1 : 1;
    *out++ = 'e';
    *out++ = exponent < 0 ? '-' : '+';
    int magnitude = exponent < 0 ? -exponent : exponent;
    if (magnitude >= 100) {
        *out++ = static_cast<char>('0' + magnitude / 100);
        magnitude %= 100;
    }
    *out++ = static_cast<char>('0' + magnitude / 10);
    *out++ = static_cast<char>('0' + magnitude % 10);
    return out;
}

// Writes a non-negative integral `magnitude` below 2^digits (2^53 for double, 2^24 for float)
// with the integer to_chars and returns the end of the text, or nullptr for any other value.
// Every such integer is exact, and no decimal with fewer significant digits lies within half a
// unit of it, so its shortest round-trip digits are its own without trailing zeros: the text is
// the one the floating to_chars gives, found without a digit search. That to_chars writes fixed
// notation unless scientific ("1e+05", at most two exponent digits here) is strictly shorter,
// which five trailing zeros or more can make it; those values are left to the general path.
template <typename Number>
char* write_exact_integer(char* out, Number magnitude) {
    constexpr auto limit =
        static_cast<Number>(std::uint64_t{1} << std::numeric_limits<Number>::digits);
    const auto integer = static_cast<std::int64_t>(magnitude < limit ? magnitude : 0);
    if (static_cast<Number>(integer) != magnitude) {
        return nullptr;
    }
    char* const end = std::to_chars(out, out + MAX_TEXT, integer).ptr;
    if (integer % 100'000 != 0 || integer == 0) {
        return end;
    }
    const char* significant_end = end;
    while (significant_end[-1] == '0') {
        --significant_end;
    }
    const auto significant = static_cast<int>(significant_end - out);
    return scientific_is_shorter(significant, static_cast<int>(end - out)) ? nullptr : end;
}

// Writes `integral`, a decimal point and the last `fraction_length` (1 to 20) digits of
// `digits`, a decimal's digits that end with its fraction, leading zeros of the fraction too;
// returns the end.
char* write_fixed(char* out, std::uint64_t integral, std::uint64_t digits, int fraction_length) {
    out = std::to_chars(out, out + MAX_TEXT, integral).ptr;
    *out++ = '.';
    return write_digits(out, digits, fraction_length);
}

// The binary exponent e of a positive normal value: 2^e <= magnitude < 2^(e + 1).
template <typename Number>
int binary_exponent(Number magnitude) {
    using Bits =
        std::conditional_t<sizeof(Number) == sizeof(std::uint64_t), std::uint64_t, std::uint32_t>;
    static_assert(sizeof(Bits) == sizeof(Number));
    Bits bits = 0;
    std::memcpy(&bits, &magnitude, sizeof bits);
    constexpr int significand_bits = std::numeric_limits<Number>::digits - 1;
    constexpr int bias = std::numeric_limits<Number>::max_exponent - 1;
    return static_cast<int>(bits >> significand_bits) - bias;
}

// The lowest binary exponent of a value from 10^-3 up: 2^-10 < 10^-3.
constexpr int LOWEST_FRACTION_EXPONENT = -10;

// For each binary exponent e from LOWEST_FRACTION_EXPONENT on, while 2^(e + 1) is below
// 2^(digits - 3): the largest k with 2^(e + 1) * 10^k <= 2^(digits - 3), so that every value
// with that exponent scaled by 10^k stays below 2^(digits - 3).
template <typename Number>
constexpr auto FRACTION_SCALES = [] {
    constexpr int room_bits = std::numeric_limits<Number>::digits - 3;
    std::array<std::size_t, room_bits - LOWEST_FRACTION_EXPONENT> scales{};
    for (std::size_t i = 0; i != scales.size(); ++i) {
        // 2^(digits - 3) / 2^(e + 1), e = LOWEST_FRACTION_EXPONENT + i.
        const int room_exponent = room_bits - 1 - LOWEST_FRACTION_EXPONENT - static_cast<int>(i);
        const auto room = static_cast<double>(std::uint64_t{1} << room_exponent);
        std::size_t scale = 0;
        while (scale + 1 != POWERS_OF_TEN.size() && POWERS_OF_TEN.at(scale + 1) <= room) {
            ++scale;
        }
        scales.at(i) = scale;
    }
    return scales;
}();

// Writes a non-negative value with a fractional part, from 10^-3 up, whose shortest
// round-trip text has few enough digits (14 or 15 significant ones for a double, 5 or 6 for a
// float), as that text in fixed notation, and returns its end; nullptr for any other value.
// Those are the numbers people and most programs write, and this is the text the floating
// to_chars gives them, found with one multiplication and one division instead of its general
// digit search. The value is scaled by the largest power of ten 10^k that keeps every value of
// its binary exponent below 2^(digits - 3):
// - The values that read back as `value` span less than a quarter at that scale, so at most
//   one integer (a k-digit decimal) lies among them, within one and a half units in the last
//   place of the rounded product: if there is one, it is the product's nearest integer.
// - Dividing that integer by 10^k, both exact, rounds the quotient as reading its decimal text
//   would: equality proves that the decimal reads back as `value`, and inequality that none
//   with k or fewer fractional digits does.
// - Without its trailing zeros it is then the only decimal of its length that reads back, and
//   every other one has more significant digits: the shortest text. From 10^-3 up, fixed
//   notation of a fraction is never longer than scientific, which to_chars takes only when it
//   is strictly shorter.
template <typename Number>
char* write_short_fraction(char* out, Number magnitude) {
    if (!(magnitude >= static_cast<Number>(1e-3))) {
        return nullptr;
    }
    const auto& scales = FRACTION_SCALES<Number>;
    const auto row =
        static_cast<std::size_t>(binary_exponent(magnitude) - LOWEST_FRACTION_EXPONENT);
    if (row >= scales.size() || scales[row] == 0) {
        return nullptr; // no room for a fractional digit
    }
    const std::size_t scale = scales[row];
    const auto power = static_cast<Number>(POWERS_OF_TEN[scale]);
    const Number scaled = magnitude * power;
    // Adding one half is exact below 2^(digits - 3); the conversion truncates.
    auto digits = static_cast<std::uint64_t>(scaled + static_cast<Number>(0.5));
    const auto nearest = static_cast<Number>(digits);
    if (nearest / power != magnitude) {
        return nullptr;
    }
    // The trailing zeros off, eight, four, two and one at a time (at most seventeen of them),
    // each divisor a constant that the compiler turns into a multiplication.
    std::size_t fraction_length = scale;
    const auto strip_zeros = [&](std::size_t count, std::uint64_t divisor) {
        const bool strip = fraction_length >= count && digits % divisor == 0;
        if (strip) {
            digits /= divisor;
            fraction_length -= count;
        }
        return strip;
    };
    while (strip_zeros(8, 100'000'000)) {
    }
    strip_zeros(4, 10'000);
    strip_zeros(2, 100);
    strip_zeros(1, 10);
    if (fraction_length == 0) {
        return nullptr; // integral: not a fraction
    }
    // The decimal's last digit is not zero, so it lies at least 10^-k from any integer, farther
    // than `value` lies from it (at most half a unit in the last place, less than a sixteenth of
    // 10^-k at this scale): the two have the same integral part, and the conversion truncates
    // to it.
    const auto integral = static_cast<std::uint64_t>(magnitude);
    return write_fixed(out, integral, digits, static_cast<int>(fraction_length));
}

// Writes an integral `magnitude` with all its digits, as to_chars' fixed notation does; from
// 2^64 up (the few up to 10^22 that it writes so) it is left to to_chars.
template <typename Number>
char* write_integer(char* out, Number magnitude) {
    constexpr Number integer_limit = 0x1p64;
    if (!(magnitude < integer_limit)) {
        return std::to_chars(out, out + MAX_TEXT, magnitude).ptr;
    }
    const auto integer = static_cast<std::uint64_t>(magnitude);
    return write_digits(out, integer, decimal_digit_count(integer));
}

// Writes any other positive finite `magnitude` in to_chars' plain form, from its shortest
// digits found by the packaged Dragonbox: among the shortest decimals that read back to the
// value the closest to it, ties to an even digit, a bound of the value's interval inside when its
// significand is even, as reading rounds; the digits to_chars finds with its own search.
template <typename Number>
char* write_shortest_decimal(char* out, Number magnitude) {
    const auto decimal =
        jkj::dragonbox::to_decimal(magnitude, jkj::dragonbox::policy::sign::ignore);
    const std::uint64_t significand = decimal.significand;
    const int count = decimal_digit_count(significand);
    const int point = count + decimal.exponent;
    if (scientific_is_shorter(count, point)) {
        return write_scientific(out, significand, count, point - 1);
    }
    if (decimal.exponent >= 0) {
        // An integer from 2^digits up: fixed notation writes all its digits, not the shortest
        // ones padded with zeros.
        return write_integer(out, magnitude);
    }
    // The decimal's integral part is the value's own (0 below 1): an integer between the two
    // would lie closer to the value and have fewer digits, and be the shortest decimal instead.
    return write_fixed(out, static_cast<std::uint64_t>(static_cast<std::int64_t>(magnitude)),
                       significand, -decimal.exponent);
}

template <typename Number>
char* write_magnitude(char* out, Number magnitude) {
    if (char* const end = write_exact_integer(out, magnitude)) {
        return end;
    }
    if (char* const end = write_short_fraction(out, magnitude)) {
        return end;
    }
    return write_shortest_decimal(out, magnitude);
}

template <typename Number>
int write_shortest(char* buffer, Number value) {
    std::string_view special;
    if (std::isnan(value)) {
        special = "0";
    } else if (std::isinf(value)) {
        special = value > 0 ? "1e999" : "-1e999";
    }
    char* end = buffer;
    if (special.empty()) {
        // Without a branch, which random signs (a mesh's coordinates) would often mislead.
        *end = '-';
        end += std::signbit(value) ? 1 : 0;
        end = write_magnitude(end, std::fabs(value));
    } else {
        end = std::copy(special.begin(), special.end(), buffer);
    }
    *end = '\0';
    return static_cast<int>(end - buffer);
}

bool is_digit(char c) {
    return c >= '0' && c <= '9';
}

// The decimal exponent of the leading non-zero digit of a number that from_chars found out of
// range: positive for an overflow, negative for an underflow. Saturates, so that exponents
// of any length are safe.
long long leading_digit_exponent(std::string_view number) {
    constexpr long long limit = 1'000'000'000;
    std::size_t i = number.empty() || number.front() != '-' ? 0 : 1;
    long long exponent = 0;
    bool seen_significant = false;
    bool after_point = false;
    for (; i < number.size() && (is_digit(number[i]) || number[i] == '.'); ++i) {
        if (number[i] == '.') {
            after_point = true;
        } else if (!seen_significant && number[i] != '0') {
            seen_significant = true;
            if (after_point) {
                --exponent;
            }
        } else if (seen_significant ? !after_point : after_point) {
            exponent += seen_significant ? 1 : -1;
        }
    }
    if (i < number.size() && (number[i] == 'e' || number[i] == 'E')) {
        ++i;
        const bool negative = i < number.size() && number[i] == '-';
        if (i < number.size() && (number[i] == '-' || number[i] == '+')) {
            ++i;
        }
        long long written = 0;
        for (; i < number.size() && is_digit(number[i]); ++i) {
            written = written < limit ? written * 10 + (number[i] - '0') : limit;
        }
        exponent += negative ? -written : written;
    }
    return exponent;
}

} // namespace

int getDoubleValueStr(char* buffer, double value) {
    return write_shortest(buffer, value);
}

int getFloatValueStr(char* buffer, float value) {
    return write_shortest(buffer, value);
}

double convertStrToDouble(const char* text) {
    const std::string_view number(text);
    double value = 0.0;
    const auto result = std::from_chars(number.data(), number.data() + number.size(), value);
    if (result.ec == std::errc::result_out_of_range) {
        const double magnitude =
            leading_digit_exponent(number) > 0 ? std::numeric_limits<double>::infinity() : 0.0;
        return number.front() == '-' ? -magnitude : magnitude;
    }
    return result.ec == std::errc() ? value : 0.0;
}
