// Reading a JSON number's text into a double.
#include "number.hpp"

#include <json/value.hpp>

#include <json/text_conversion.hpp>

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <iterator>
#include <limits>
#include <stdexcept>
#include <string>

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

namespace {

constexpr std::size_t EXACT_INTEGER_DIGITS = 15; // every integer of up to fifteen digits is exact
constexpr std::size_t DIGITS_BELOW_2_TO_64 = 19; // every integer of up to nineteen is below 2^64

// What one look at a literal finds: its integer part (its value, when it has at most nineteen
// digits) and whether a fraction or an exponent follows it.
struct Layout {
    bool negative;
    std::size_t integer_digits;
    std::uint64_t integer;
    bool integer_only; // nothing follows the integer part
    bool exponent;
};

// Whether [from, to), the part of a literal after its integer part (its fraction and then its
// exponent), has an exponent. Eight bytes at a time: setting bit 0x20 of each makes an 'E' an
// 'e' and leaves digits, signs and the point as they are; the exclusive or with eight 'e's
// then leaves a zero byte exactly where an exponent starts.
bool has_exponent(const char* from, const char* to) noexcept {
    constexpr std::uint64_t each_byte = 0x0101010101010101U;
    for (; to - from >= 8; from += 8) {
        std::uint64_t word = 0;
        std::memcpy(&word, from, sizeof word);
        word = (word | 0x20 * each_byte) ^ ('e' * each_byte);
        if (((word - each_byte) & ~word & 0x80 * each_byte) != 0) {
            return true;
        }
    }
    for (; from != to; ++from) {
        if ((*from | 0x20) == 'e') {
            return true;
        }
    }
    return false;
}

Layout layout_of(std::string_view literal) noexcept {
    Layout layout{};
    const char* next = literal.data();
    const char* const end = next + literal.size();
    layout.negative = *next == '-';
    next += layout.negative ? 1 : 0;
    const char* const first = next;
    for (; next != end && static_cast<unsigned char>(*next - '0') < 10; ++next) {
        layout.integer = 10 * layout.integer + static_cast<std::uint64_t>(*next - '0');
    }
    layout.integer_digits = static_cast<std::size_t>(next - first);
    layout.integer_only = next == end;
    layout.exponent = has_exponent(next, end);
    return layout;
}

// A number read_short_number did not take (read_number tries it first, and so does the parser
// before read_number_checked; a short number that comes here anyway is read by the library, to
// the same double). An integer of up to nineteen digits (below 10^19, so below 2^64) is
// converted from its 64-bit value, which rounds once, to nearest, as the library does; the
// others by the library.
double read_laid_out(std::string_view literal, const Layout& layout) noexcept {
    if (layout.integer_only && layout.integer_digits <= DIGITS_BELOW_2_TO_64) {
        const auto magnitude = static_cast<double>(layout.integer);
        return layout.negative ? -magnitude : magnitude;
    }
    return string_to_double(literal.data());
}

} // namespace

double read_number(std::string_view literal) noexcept {
    double value = 0.0;
    return read_short_number(literal, value) ? value : read_laid_out(literal, layout_of(literal));
}

bool may_change(std::string_view literal) noexcept {
    const Layout layout = layout_of(literal);
    return layout.integer_digits > EXACT_INTEGER_DIGITS || layout.exponent;
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

NumberChange read_number_checked(std::string_view literal, double& value) {
    const Layout layout = layout_of(literal);
    value = read_laid_out(literal, layout);
    if (layout.integer_digits <= EXACT_INTEGER_DIGITS && !layout.exponent) {
        return NumberChange::NONE;
    }
    if (!std::isfinite(value)) {
        return NumberChange::OVERFLOW;
    }
    if (!layout.integer_only) {
        return NumberChange::NONE; // a fraction or an exponent is rounded as asked
    }
    // JSON integers have no leading zeros: equal values have equal digits. Below 2^64 a double
    // that is an integer converts back to one.
    const double magnitude = std::fabs(value);
    if (layout.integer_digits <= DIGITS_BELOW_2_TO_64) {
        return static_cast<std::uint64_t>(magnitude) == layout.integer
                   ? NumberChange::NONE
                   : NumberChange::INEXACT_INTEGER;
    }
    return literal.substr(layout.negative ? 1 : 0) == exact_integer_text(magnitude)
               ? NumberChange::NONE
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
