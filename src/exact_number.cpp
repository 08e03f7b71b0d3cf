// Whether a number's text survives a read into a double and the writer's text of that double
// as the same decimal number.
#include "number.hpp"

#include <json/detail/byte_scan.hpp>
#include <json/text_conversion.hpp>

#include <algorithm>
#include <array>
#include <cfloat>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <optional>

namespace json::detail {

namespace {

__extension__ typedef unsigned __int128 Unsigned128; // NOLINT(modernize-use-using)
__extension__ typedef __int128 Signed128;            // NOLINT(modernize-use-using)

// A JSON number's text taken apart: its significant digits (from the first non-zero digit to
// the last, a '.' perhaps among them), their count and the power of ten of the last of them.
struct DecimalText {
    bool negative = false;
    std::string_view digits; // empty for zero
    std::size_t count = 0;
    long long last_exponent = 0;
};

// The value of an exponent's digits, saturated: no double has a decimal exponent anywhere near
// the limit, so a larger one compares unequal all the same.
long long exponent_value(const char* here, const char* end) {
    constexpr long long limit = 1'000'000'000;
    const bool negative = *here == '-';
    here += *here == '-' || *here == '+' ? 1 : 0;
    long long written = 0;
    for (; here != end; ++here) {
        written = std::min(limit, written * 10 + (*here - '0'));
    }
    return negative ? -written : written;
}

DecimalText take_apart(std::string_view number) {
    DecimalText decimal;
    const char* here = number.data();
    const char* const end = here + number.size();
    decimal.negative = *here == '-';
    here += decimal.negative ? 1 : 0;
    // The text is a JSON number: digits, perhaps a point and digits, perhaps an exponent.
    const char* const point = skip_digits(here, end);
    const char* const mantissa_end =
        point != end && *point == '.' ? skip_digits(point + 1, end) : point;
    const auto is_zero_or_point = [](char c) { return c == '0' || c == '.'; };
    const char* const first = std::find_if_not(here, mantissa_end, is_zero_or_point);
    if (first == mantissa_end) {
        return decimal; // zero, whatever its exponent
    }
    const char* last = mantissa_end - 1;
    while (is_zero_or_point(*last)) {
        --last;
    }
    decimal.digits = std::string_view(first, static_cast<std::size_t>(last - first + 1));
    decimal.count = decimal.digits.size() - (first < point && point < last ? 1 : 0);
    // The last significant digit's place, counted from the point: 0 just before it.
    decimal.last_exponent = last < point ? static_cast<long long>(point - last - 1)
                                         : -static_cast<long long>(last - point);
    if (mantissa_end != end) {
        decimal.last_exponent += exponent_value(mantissa_end + 1, end);
    }
    return decimal;
}

bool same_decimal(const DecimalText& left, const DecimalText& right) {
    if (left.count == 0 || right.count == 0) {
        return left.count == right.count; // zero equals zero whatever the sign
    }
    if (left.negative != right.negative || left.count != right.count ||
        left.last_exponent != right.last_exponent) {
        return false;
    }
    // Digit by digit, each side stepping over its point.
    std::size_t l = 0;
    std::size_t r = 0;
    while (l < left.digits.size() && r < right.digits.size()) {
        if (left.digits[l] == '.') {
            ++l;
        } else if (right.digits[r] == '.') {
            ++r;
        } else if (left.digits[l++] != right.digits[r++]) {
            return false;
        }
    }
    return true;
}

// A number of at most nineteen significant digits as M * 10^e, M without trailing zeros (0 for
// zero): what the fast check below works on.
struct Significand {
    std::uint64_t digits = 0;
    long long last_exponent = 0;
};

// The words below hold eight bytes of text in memory order, the first in the lowest byte.
static_assert(__BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__, "digits are read eight at a time");

constexpr std::uint64_t TEN_TO_THE[] = {1, 10, 100, 1000, 10000, 100000, 1000000, 10000000};

// Whether the eight bytes of `chunk` are all decimal digits: each byte's high half is 3, and
// stays 3 when 6 is added to it (so its low half is at most 9).
bool eight_digits_in(std::uint64_t chunk) {
    constexpr std::uint64_t highs = 0xF0F0F0F0F0F0F0F0U;
    constexpr std::uint64_t threes = 0x3030303030303030U;
    return (chunk & highs) == threes && ((chunk + 0x0606060606060606U) & highs) == threes;
}

// The value of the eight decimal digits in `chunk`, combined pairwise in one word: digits to
// pairs, pairs to fours, fours to eight.
std::uint64_t eight_digits_value(std::uint64_t chunk) {
    chunk -= 0x3030303030303030U;
    chunk = chunk * 10 + (chunk >> 8U);
    return ((chunk & 0x000000FF000000FFU) * (100 + (1000000ULL << 32U)) +
            ((chunk >> 16U) & 0x000000FF000000FFU) * (1 + (10000ULL << 32U))) >>
           32U;
}

// One pass over a JSON number's text, eight digits at a time where it can; nothing when it has
// more than nineteen digits (trailing zeros included) after its leading zeros.
std::optional<Significand> read_significand(std::string_view number) {
    constexpr std::size_t max_digits = 19; // below 2^64
    const char* here = number.data();
    const char* const end = here + number.size();
    here += *here == '-' ? 1 : 0;
    Significand significand;
    std::size_t count = 0;
    // Appends the run of digits at `here` and moves past it.
    const auto append_digits = [&] {
        const char* const first = here;
        std::uint64_t chunk = 0;
        while (end - here >= 8 &&
               (std::memcpy(&chunk, here, sizeof chunk), eight_digits_in(chunk))) {
            significand.digits = significand.digits * 100000000 + eight_digits_value(chunk);
            here += 8;
        }
        // Fewer than eight digits that end the text (the usual end of a fraction): the eight
        // bytes that end there, those before `here` (read already) turned into zeros.
        const auto tail = static_cast<std::size_t>(end - here);
        if (tail != 0 && tail < 8 && static_cast<std::size_t>(end - number.data()) >= 8) {
            std::memcpy(&chunk, end - 8, sizeof chunk);
            const auto read_bits = static_cast<unsigned>(8 * (8 - tail));
            const std::uint64_t read_mask = (std::uint64_t{1} << read_bits) - 1;
            chunk = (chunk & ~read_mask) | (0x3030303030303030U & read_mask);
            if (eight_digits_in(chunk)) {
                significand.digits =
                    significand.digits * TEN_TO_THE[tail] + eight_digits_value(chunk);
                here = end;
            }
        }
        for (; here != end && *here >= '0' && *here <= '9'; ++here) {
            significand.digits = significand.digits * 10 + static_cast<std::uint64_t>(*here - '0');
        }
        count += static_cast<std::size_t>(here - first);
    };
    if (*here == '0') {
        ++here; // JSON's only leading zero is a lone "0"
    } else {
        append_digits();
    }
    if (here != end && *here == '.') {
        const char* const fraction = ++here;
        if (count == 0) {
            while (here != end && *here == '0') {
                ++here; // after "0." the fraction's leading zeros are not significant
            }
        }
        append_digits();
        significand.last_exponent -= here - fraction;
    }
    if (count > max_digits) {
        return std::nullopt; // the digits overflowed
    }
    if (significand.digits == 0) {
        return Significand{};
    }
    if (here != end) {
        significand.last_exponent += exponent_value(here + 1, end);
    }
    while (significand.digits % 10 == 0) {
        significand.digits /= 10;
        ++significand.last_exponent;
    }
    return significand;
}

enum class Verdict { EXACT, INEXACT, UNKNOWN };

constexpr int MAX_SCALE = 18; // 2 * 10^18 < 2^63

constexpr std::array<std::uint64_t, MAX_SCALE + 1> make_powers_of_ten() {
    std::array<std::uint64_t, MAX_SCALE + 1> powers{};
    std::uint64_t power = 1;
    for (std::uint64_t& entry : powers) {
        entry = power;
        power *= 10;
    }
    return powers;
}

constexpr std::array<std::uint64_t, MAX_SCALE + 1> POWERS_OF_TEN = make_powers_of_ten();

// The writer gives a double below 2^53 its shortest round-trip digits (of those, the closest
// to it). So a literal of n significant digits, L = M * 10^e, is written back as itself exactly
// when (1) L is the n-digit decimal closest to d, the double it was read as, and (2) no decimal
// of n - 1 digits reads as d; it is enough to try the two that bracket L, L rounded down and up
// at digit n - 1. A decimal reads as d when it lies within half a gap between doubles of d,
// the bounds themselves included when d's significand is even (ties round to even).
//
// Everything is compared exactly in integers after scaling by 4 * 10^-e * 2^-q (d being m * 2^q):
// L becomes M * 2^(2-q), d becomes 4m * 10^-e, half a gap 2 * 10^-e (half that below a power of
// two, where the gap below is half as wide), and a unit of L's last digit 2^(2-q). L - d is
// found in 128 bits; once (1) holds it is below half a unit, and the rest fits 64 bits when
// -18 <= e <= 0 and -57 <= q <= 0: for doubles from 2^-5 below 2^53 (coordinates, prices,
// measurements of ordinary size) and up to 19 digits. UNKNOWN elsewhere, and for the one case
// the rule does not settle, L exactly halfway between two n-digit candidates.
Verdict shortest_digits_verdict(const Significand& literal, double value) {
    const long long e = literal.last_exponent;
    if (literal.digits == 0 || e > 0 || e < -MAX_SCALE) {
        return Verdict::UNKNOWN;
    }
    std::uint64_t bits = 0;
    std::memcpy(&bits, &value, sizeof bits);
    const auto exponent_field = static_cast<int>(bits >> 52U & 0x7FFU);
    const std::uint64_t m = (bits & ((std::uint64_t{1} << 52U) - 1)) | std::uint64_t{1} << 52U;
    const int q = exponent_field - 1075;
    if (q > 0 || q < -57) {
        return Verdict::UNKNOWN;
    }
    const std::uint64_t power_of_ten = POWERS_OF_TEN[static_cast<std::size_t>(-e)];
    const auto shift = static_cast<unsigned>(2 - q);
    const Signed128 offset = static_cast<Signed128>(Unsigned128{literal.digits} << shift) -
                             static_cast<Signed128>((Unsigned128{m} << 2U) * power_of_ten); // L - d
    const std::int64_t half_unit = std::int64_t{1} << (shift - 1);
    const Signed128 distance = offset < 0 ? -offset : offset;
    if (distance == half_unit) {
        return Verdict::UNKNOWN;
    }
    if (distance > half_unit) {
        return Verdict::INEXACT; // another n-digit decimal is closer to d
    }
    const auto near = static_cast<std::int64_t>(offset);
    const std::int64_t unit = 2 * half_unit;
    const auto half_gap_above = static_cast<std::int64_t>(2 * power_of_ten);
    const bool power_of_two_below = m == std::uint64_t{1} << 52U && exponent_field > 1;
    const std::int64_t half_gap_below = power_of_two_below ? half_gap_above / 2 : half_gap_above;
    const bool bounds_read_as_value = m % 2 == 0;
    const auto last_digit = static_cast<std::int64_t>(literal.digits % 10);
    const std::int64_t rounded_down = near - last_digit * unit;
    const std::int64_t rounded_up = near + (10 - last_digit) * unit;
    const bool down_reads_as_value =
        rounded_down > -half_gap_below || (rounded_down == -half_gap_below && bounds_read_as_value);
    const bool up_reads_as_value =
        rounded_up < half_gap_above || (rounded_up == half_gap_above && bounds_read_as_value);
    return down_reads_as_value || up_reads_as_value ? Verdict::INEXACT : Verdict::EXACT;
}

// Whether `value`, read from `literal` (whose significand, when it has at most nineteen
// digits, is given), is written back as the same decimal number.
bool written_back_exactly(const std::optional<Significand>& significand, std::string_view literal,
                          double value) {
    if (!std::isfinite(value)) {
        return false;
    }
    if (significand) {
        switch (shortest_digits_verdict(*significand, std::fabs(value))) {
        case Verdict::EXACT:
            return true;
        case Verdict::INEXACT:
            return false;
        case Verdict::UNKNOWN:
            break;
        }
    }
    char written[NUMBER_TEXT_SIZE];
    const char* const end = write_number(written, value);
    return same_decimal(
        take_apart(literal),
        take_apart(std::string_view(written, static_cast<std::size_t>(end - written))));
}

} // namespace

// Up to fifteen significant digits (the literal has at least as many characters) come back
// unchanged from a normal double (DBL_DIG), and the writer writes every double below 2^53 with
// its shortest digits: those need no check. Anything else is read and checked in one pass.
bool read_number_exactly(std::string_view literal, double& value) noexcept {
    if (literal.size() <= DBL_DIG) {
        constexpr double exact_integers = 9007199254740992.0; // 2^53
        value = read_number(literal);
        const double magnitude = std::fabs(value);
        if (magnitude >= DBL_MIN && magnitude <= exact_integers) {
            return true;
        }
    }
    const std::optional<Significand> significand = read_significand(literal);
    const std::optional<double> direct =
        significand ? scaled_exactly(significand->digits, significand->last_exponent)
                    : std::nullopt;
    if (direct) {
        value = literal.front() == '-' ? -*direct : *direct;
    } else {
        value = string_to_double(literal.data());
    }
    return written_back_exactly(significand, literal, value);
}

} // namespace json::detail
