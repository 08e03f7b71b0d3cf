#include "number_text.hpp"

#include <charconv>
#include <cmath>
#include <cstring>
#include <limits>
#include <string_view>

namespace {

constexpr std::size_t MAX_TEXT = 79;

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
        // The shortest round-trip form needs at most 24 characters for a double, so this
        // cannot run out of room.
        end = std::to_chars(buffer, buffer + MAX_TEXT, value).ptr;
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
