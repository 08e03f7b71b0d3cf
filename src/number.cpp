// Reading a JSON number's text into a double.
#include "number.hpp"

#include <json/text_conversion.hpp>

namespace json::detail {

std::optional<double> scaled_exactly(std::uint64_t digits, long long exponent) noexcept {
    constexpr std::uint64_t exact_integers = std::uint64_t{1} << 53U;
    constexpr long long largest_exact_power = 22;
    static constexpr double powers_of_ten[largest_exact_power + 1] = {
        1e0,  1e1,  1e2,  1e3,  1e4,  1e5,  1e6,  1e7,  1e8,  1e9,  1e10, 1e11,
        1e12, 1e13, 1e14, 1e15, 1e16, 1e17, 1e18, 1e19, 1e20, 1e21, 1e22};
    if (digits > exact_integers || exponent < -largest_exact_power ||
        exponent > largest_exact_power) {
        return std::nullopt;
    }
    const auto number = static_cast<double>(digits);
    const double power = powers_of_ten[exponent < 0 ? -exponent : exponent];
    return exponent < 0 ? number / power : number * power;
}

// A literal without an exponent whose digits, the point left out, number at most fifteen is
// converted here, by scaled_exactly: those digits are below 2^53 and the power of ten at most
// 10^15. Most numbers in documents (counts, ids, coordinates, prices) take this path; the
// others go to the number-text library.
double read_number(std::string_view literal) noexcept {
    constexpr std::ptrdiff_t most_digits = 15;
    // A sign, fifteen digits and a point at most: longer literals are not read twice.
    if (literal.size() > most_digits + 2) {
        return string_to_double(literal.data());
    }
    const auto is_digit = [](char c) { return c >= '0' && c <= '9'; };
    const char* next = literal.data();
    const char* const end = next + literal.size();
    const bool negative = *next == '-';
    next += negative ? 1 : 0;
    std::uint64_t digits = 0;
    const auto read_digits = [&] {
        const char* const first = next;
        for (; next != end && is_digit(*next); ++next) {
            digits = 10 * digits + static_cast<std::uint64_t>(*next - '0');
        }
        return next - first;
    };
    std::ptrdiff_t count = read_digits();
    std::ptrdiff_t decimals = 0;
    if (next != end && *next == '.') {
        ++next;
        decimals = read_digits();
        count += decimals;
    }
    if (next != end || count > most_digits) {
        return string_to_double(literal.data()); // an exponent, or too many digits
    }
    const double magnitude = *scaled_exactly(digits, -decimals);
    return negative ? -magnitude : magnitude;
}

double string_to_double(const char* text) {
    return convertStrToDouble(text);
}

} // namespace json::detail
