// Reading a JSON number's text into a double.
#include "number.hpp"

#include <json/value.hpp>

#include <json/text_conversion.hpp>

#include <charconv>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <limits>
#include <stdexcept>
#include <string>
#include <system_error>

namespace json::detail {

std::optional<double> scaled_exactly(std::uint64_t digits, long long exponent) noexcept {
    constexpr std::uint64_t exact_integers = std::uint64_t{1} << 53U;
    constexpr long long largest_exact_power = std::size(EXACT_POWERS_OF_TEN) - 1;
    if (digits > exact_integers || exponent < -largest_exact_power ||
        exponent > largest_exact_power) {
        return std::nullopt;
    }
    const auto number = static_cast<double>(digits);
    const double power = EXACT_POWERS_OF_TEN[exponent < 0 ? -exponent : exponent];
    return exponent < 0 ? number / power : number * power;
}

// Besides the short numbers, an integer of up to nineteen digits (below 10^19, so below 2^64)
// is converted here, from its 64-bit value: that conversion rounds once, to nearest, as the
// number-text library does. The others go to the library.
double read_number(std::string_view literal) noexcept {
    double value = 0.0;
    if (read_short_number(literal, value)) {
        return value;
    }
    constexpr std::size_t most_integer_digits = 19;
    const bool negative = literal.front() == '-';
    const std::string_view digits = literal.substr(negative ? 1 : 0);
    std::uint64_t integer = 0;
    if (digits.size() <= most_integer_digits &&
        std::from_chars(digits.data(), digits.data() + digits.size(), integer).ptr ==
            digits.data() + digits.size()) {
        const auto magnitude = static_cast<double>(integer);
        return negative ? -magnitude : magnitude;
    }
    return string_to_double(literal.data());
}

namespace {

// Where the integer part of a literal ends: at its point, its exponent or its end. A loop of
// its own: a search for any of three bytes calls memchr for every byte of the literal.
std::size_t integer_part_end(std::string_view literal) noexcept {
    std::size_t at = 0;
    while (at != literal.size() && literal[at] != '.' && literal[at] != 'e' && literal[at] != 'E') {
        ++at;
    }
    return at;
}

} // namespace

bool may_change(std::string_view literal) noexcept {
    constexpr std::size_t exact_digits = 15; // every integer of up to fifteen digits is exact
    const std::size_t sign = literal.front() == '-' ? 1 : 0;
    const std::size_t point_or_exponent = integer_part_end(literal);
    if (point_or_exponent - sign > exact_digits) {
        return true; // an integer part beyond the exact integers
    }
    // Past the integer part come the fraction and then the exponent.
    for (std::size_t at = point_or_exponent; at != literal.size(); ++at) {
        if (literal[at] == 'e' || literal[at] == 'E') {
            return true;
        }
    }
    return false;
}

namespace {

// The decimal digits of `high` * 2^shift, most significant first.
std::string decimal_of(std::uint64_t high, int shift) {
    std::string digits = std::to_string(high); // most significant first
    // Doubled in place, digit by digit from the end: at most 971 doublings of 309 digits.
    for (int step = 0; step < shift; ++step) {
        int carry = 0;
        for (auto digit = digits.rbegin(); digit != digits.rend(); ++digit) {
            const int doubled = (*digit - '0') * 2 + carry;
            *digit = static_cast<char>('0' + doubled % 10);
            carry = doubled / 10;
        }
        if (carry != 0) {
            digits.insert(digits.begin(), static_cast<char>('0' + carry));
        }
    }
    return digits;
}

} // namespace

std::string exact_integer_text(double value) {
    const double magnitude = std::fabs(value);
    std::string digits;
    if (magnitude < 18446744073709551616.0) { // 2^64
        digits = std::to_string(static_cast<std::uint64_t>(magnitude));
    } else {
        int exponent = 0;
        const double significand = std::frexp(magnitude, &exponent); // in [0.5, 1)
        constexpr int significand_bits = 53;
        digits = decimal_of(static_cast<std::uint64_t>(std::ldexp(significand, significand_bits)),
                            exponent - significand_bits);
    }
    return std::signbit(value) ? "-" + digits : digits;
}

NumberChange change_of(std::string_view literal, double value) {
    if (!std::isfinite(value)) {
        return NumberChange::OVERFLOW;
    }
    constexpr double exact_integers = 9007199254740992.0; // 2^53: every integer below is exact
    const double magnitude = std::fabs(value);
    if (magnitude < exact_integers || integer_part_end(literal) != literal.size()) {
        return NumberChange::NONE; // a fraction or an exponent is rounded as asked
    }
    // JSON integers have no leading zeros: equal values have equal digits. An integer below
    // 2^64 is compared as one, a longer one with the double's exact decimal digits.
    const std::string_view digits = literal.substr(literal.front() == '-' ? 1 : 0);
    constexpr double past_64_bits = 18446744073709551616.0; // 2^64
    std::uint64_t integer = 0;
    if (magnitude < past_64_bits &&
        std::from_chars(digits.data(), digits.data() + digits.size(), integer).ec == std::errc()) {
        return static_cast<std::uint64_t>(magnitude) == integer ? NumberChange::NONE
                                                                : NumberChange::INEXACT_INTEGER;
    }
    return digits == exact_integer_text(magnitude) ? NumberChange::NONE
                                                   : NumberChange::INEXACT_INTEGER;
}

namespace {

// Refuses an integer that no double holds, naming the double nearest to it.
template <typename Integer>
double checked_double(Integer number) {
    const auto nearest = static_cast<double>(number);
    // The range of Integer is [min, 2^digits): both ends are exact doubles.
    constexpr double past_largest =
        static_cast<double>(std::uint64_t{1} << (std::numeric_limits<Integer>::digits - 1)) * 2;
    if (nearest < past_largest && static_cast<Integer>(nearest) == number) {
        return nearest;
    }
    throw std::out_of_range(
        std::to_string(number) + " cannot be held exactly by a double (the nearest is " +
        exact_integer_text(nearest) + "): keep it as a string, or convert it to a double first");
}

} // namespace

double checked_exact_double(long long number) {
    return checked_double(number);
}

double checked_exact_double(unsigned long long number) {
    return checked_double(number);
}

double string_to_double(const char* text) {
    return convertStrToDouble(text);
}

} // namespace json::detail
