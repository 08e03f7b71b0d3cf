#ifndef JSON_SRC_NUMBER_HPP
#define JSON_SRC_NUMBER_HPP

// Numbers between text and double: the one place that reads a JSON number's text into a double,
// tells whether it survives the round trip, and writes a double's text. The only caller of the
// number-text library. (The syntax of a number is json/detail/number_syntax.hpp's.)

#include <number_text.hpp>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <type_traits>

namespace json::detail {

/// The powers of ten that doubles hold exactly.
inline constexpr double EXACT_POWERS_OF_TEN[] = {1e0,  1e1,  1e2,  1e3,  1e4,  1e5,  1e6,  1e7,
                                                 1e8,  1e9,  1e10, 1e11, 1e12, 1e13, 1e14, 1e15,
                                                 1e16, 1e17, 1e18, 1e19, 1e20, 1e21, 1e22};

/// `digits` times ten to the power `exponent`, when one rounding gives it: digits up to 2^53
/// and a power of ten of at most 10^22 either way are both doubles exactly, so the one product
/// or quotient is the double nearest to the number. Nothing otherwise. Throws nothing.
std::optional<double> scaled_exactly(std::uint64_t digits, long long exponent) noexcept;

/// Reads the JSON number `literal` into `value` when it has no exponent and at most fifteen
/// digits, the point left out, as most numbers in documents have (counts, ids, coordinates,
/// prices): its digits are below 2^53 and the power of ten at most 10^15, so that one division
/// gives the double nearest to it, and an integer comes out exact. False, `value` untouched,
/// for any other number. Inline: most numbers a parse reads take this path alone. Linear in
/// the length of the literal; throws nothing.
[[gnu::always_inline]] inline bool read_short_number(std::string_view literal,
                                                     double& value) noexcept {
    constexpr std::size_t most_digits = 15;
    // A sign, fifteen digits and a point at most.
    if (literal.empty() || literal.size() > most_digits + 2) {
        return false;
    }
    const char* next = literal.data();
    const char* const end = next + literal.size();
    const bool negative = *next == '-';
    next += negative ? 1 : 0;
    const char* point = end;
    std::uint64_t digits = 0;
    for (; next != end; ++next) {
        const auto digit = static_cast<unsigned>(static_cast<unsigned char>(*next) - '0');
        if (digit < 10) {
            digits = 10 * digits + digit;
        } else if (*next == '.') {
            point = next;
        } else {
            return false; // an exponent
        }
    }
    const std::size_t decimals = point == end ? 0 : static_cast<std::size_t>(end - point - 1);
    if (literal.size() - (negative ? 1 : 0) - (point == end ? 0 : 1) > most_digits) {
        return false;
    }
    const double magnitude = static_cast<double>(digits) / EXACT_POWERS_OF_TEN[decimals];
    value = negative ? -magnitude : magnitude;
    return true;
}

/// The double nearest to the JSON number `literal`, which must be NUL-terminated: a short
/// number (see read_short_number) or an integer of up to nineteen digits is converted here,
/// others by the number-text library. Throws nothing.
double read_number(std::string_view literal) noexcept;

/// What reading a number's text into a double changes beyond rounding a fraction, the two
/// changes json::parse refuses unless asked: an integer a double cannot hold exactly
/// (`1234567890123456789`), and a number beyond the range of double, which becomes an
/// infinity (`1e400`).
enum class NumberChange : unsigned char { NONE, INEXACT_INTEGER, OVERFLOW };

/// Whether reading `literal` can change it as NumberChange says: only a literal with an
/// exponent, or with sixteen or more digits before its point, can. Linear in its length, one
/// look at it. Throws nothing.
bool may_change(std::string_view literal) noexcept;

/// Reads the JSON number `literal` (NUL-terminated) into `value`, the double read_number gives,
/// and returns what that changed. One look at the literal finds both; an integer of up to
/// nineteen digits is compared as a 64-bit integer, a longer one with the double's exact
/// decimal digits. Meant for a literal read_short_number did not take: it does not try that
/// path again. Throws std::bad_alloc.
NumberChange read_number_checked(std::string_view literal, double& value);

/// The exact decimal digits of a double that is an integer (as every double from 2^53 up is),
/// with its sign: "1234567890123456768". Throws std::bad_alloc.
std::string exact_integer_text(double value);

/// Reads the JSON number `literal` (NUL-terminated) into `value`, the double read_number gives,
/// and tells whether write_number writes that double back as text that denotes the same
/// decimal number (`1.50` and `1.5`, `1E2` and `100`, `-0` and `0` do). Constant time for up to
/// fifteen significant digits between DBL_MIN and 2^53, and for up to nineteen between 2^-5 and
/// 2^53; other numbers are written out and compared digit by digit. Throws nothing.
bool read_number_exactly(std::string_view literal, double& value) noexcept;

/// The room the number-text library is given for a number's text.
constexpr std::size_t NUMBER_TEXT_SIZE = 80;

/// Writes the shortest text that reads back to the finite `number` into the NUMBER_TEXT_SIZE
/// bytes at `buffer`, zero-filled first as the number-text library expects, and returns the end
/// of the text (its first NUL). Inline: the writer calls it for every number. Throws nothing.
template <typename Number>
char* write_number(char* buffer, Number number) noexcept {
    std::memset(buffer, 0, NUMBER_TEXT_SIZE);
    if constexpr (std::is_same_v<Number, float>) {
        getFloatValueStr(buffer, number);
    } else {
        getDoubleValueStr(buffer, number);
    }
    // Read a byte at a time on purpose: the text was stored a byte or two at a time an instant
    // ago, and a wider load over those stores cannot be served from the store buffer and waits
    // for them to reach the cache, which costs more than the few byte loads of a number's text.
    char* end = buffer;
    while (end != buffer + NUMBER_TEXT_SIZE && *end != '\0') {
        ++end;
    }
    return end;
}

} // namespace json::detail

#endif
