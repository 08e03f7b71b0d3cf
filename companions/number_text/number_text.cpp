#include "number_text.hpp"

#include <charconv>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string_view>

namespace {

constexpr std::size_t MAX_TEXT = 79;

// Writes an integral value of magnitude below 2^digits (2^53 for double, 2^24 for float) with
// the integer to_chars and returns the end of the text, or nullptr for any other value. Every
// such integer is exact, and no decimal with fewer significant digits lies within half a unit of
// it, so its shortest round-trip digits are its own without trailing zeros: the text is the one
// the floating to_chars gives, found without its digit search. That to_chars writes fixed
// notation unless scientific ("1e+05", at most two exponent digits here) is strictly shorter,
// which trailing zeros alone can make it; those values, and -0, are left to it.
template <typename Number>
char* write_exact_integer(char* buffer, Number value) {
    constexpr auto limit =
        static_cast<Number>(std::uint64_t{1} << std::numeric_limits<Number>::digits);
    if (!(value > -limit && value < limit) || (value == 0 && std::signbit(value))) {
        return nullptr;
    }
    const auto integer = static_cast<std::int64_t>(value);
    if (static_cast<Number>(integer) != value) {
        return nullptr;
    }
    char* const end = std::to_chars(buffer, buffer + MAX_TEXT, integer).ptr;
    const char* const first_digit = buffer + (integer < 0 ? 1 : 0);
    const auto digits = end - first_digit;
    const char* significant_end = end;
    while (significant_end - first_digit > 1 && significant_end[-1] == '0') {
        --significant_end;
    }
    const auto significant = significant_end - first_digit;
    const auto scientific_length = significant + (significant > 1 ? 1 : 0) + 4;
    return digits <= scientific_length ? end : nullptr;
}

template <typename Number>
char* write_finite(char* buffer, Number value) {
    if (char* const end = write_exact_integer(buffer, value)) {
        return end;
    }
    // The shortest round-trip form needs at most 24 characters for a double, so this cannot run
    // out of room.
    return std::to_chars(buffer, buffer + MAX_TEXT, value).ptr;
}

template <typename Number>
int write_shortest(char* buffer, Number value) {
    std::string_view special;
    if (std::isnan(value)) {
        special = "0";
    } else if (std::isinf(value)) {
        special = value > 0 ? "1e999" : "-1e999";
    }
    char* const end = special.empty() ? write_finite(buffer, value)
                                      : std::copy(special.begin(), special.end(), buffer);
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
