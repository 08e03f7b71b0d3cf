// Whether a number's text survives a read into a double and the writer's text of that double
// as the same decimal number.
#include <json/parse.hpp>

#include <number_text.hpp>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <cstring>

namespace json::detail {

namespace {

__extension__ typedef unsigned __int128 Unsigned128; // NOLINT(modernize-use-using)
__extension__ typedef __int128 Signed128;            // NOLINT(modernize-use-using)

// A JSON number's text taken apart: the digits of its mantissa from the first significant
// one to the last (a '.' may stand among them), and the power of ten of the last of them.
struct DecimalText {
    bool negative = false;
    std::string_view digits; // empty for zero
    std::size_t count = 0;   // significant digits in `digits`
    long long last_exponent = 0;
};

DecimalText take_apart(std::string_view number) {
    DecimalText decimal;
    decimal.negative = !number.empty() && number.front() == '-';
    const std::size_t mantissa_start = decimal.negative ? 1 : 0;
    const std::size_t exponent_mark = number.find_first_of("eE", mantissa_start);
    const std::string_view mantissa = number.substr(
        mantissa_start, exponent_mark == std::string_view::npos ? std::string_view::npos
                                                                : exponent_mark - mantissa_start);
    const std::size_t first = mantissa.find_first_not_of("0.");
    if (first == std::string_view::npos) {
        return decimal; // zero, whatever its exponent
    }
    const std::size_t last = mantissa.find_last_not_of("0.");
    const std::size_t point = std::min(mantissa.find('.'), mantissa.size());
    decimal.digits = mantissa.substr(first, last - first + 1);
    const bool point_inside = first < point && point < last;
    decimal.count = decimal.digits.size() - (point_inside ? 1 : 0);
    // The last significant digit's place, counted from the point: 0 just before it.
    decimal.last_exponent = last < point ? static_cast<long long>(point - last - 1)
                                         : -static_cast<long long>(last - point);
    if (exponent_mark != std::string_view::npos) {
        // Saturated: no double has a decimal exponent anywhere near the limit, so a larger one
        // compares unequal all the same.
        constexpr long long limit = 1'000'000'000;
        std::size_t at = exponent_mark + 1;
        const bool negative_exponent = number[at] == '-';
        at += number[at] == '-' || number[at] == '+' ? 1 : 0;
        long long written = 0;
        for (; at < number.size(); ++at) {
            written = std::min(limit, written * 10 + (number[at] - '0'));
        }
        decimal.last_exponent += negative_exponent ? -written : written;
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

enum class Verdict { EXACT, INEXACT, UNKNOWN };

constexpr long long MAX_SCALE = 21; // 4m * 10^21 < 2^125

constexpr std::array<Unsigned128, MAX_SCALE + 1> make_powers_of_ten() {
    std::array<Unsigned128, MAX_SCALE + 1> powers{};
    Unsigned128 power = 1;
    for (Unsigned128& entry : powers) {
        entry = power;
        power *= 10;
    }
    return powers;
}

constexpr std::array<Unsigned128, MAX_SCALE + 1> POWERS_OF_TEN = make_powers_of_ten();

// The writer gives a double below 2^53 its shortest round-trip digits (of those, the closest
// to it). So a literal of n significant digits, L = M * 10^e, is written back as itself exactly
// when (1) L is the n-digit decimal closest to d, the double it was read as, and (2) no decimal
// of n - 1 digits reads as d; it is enough to try the two that bracket L, L rounded down and up
// at digit n - 1. A decimal reads as d when it lies within half a gap between doubles of d,
// the bounds themselves included when d's significand is even (ties round to even).
//
// Everything is compared exactly in 128-bit integers after scaling by 4 * 10^-e * 2^-q (d being
// m * 2^q): L becomes M * 2^(2-q), d becomes 4m * 10^-e, half a gap 2 * 10^-e (half that below
// a power of two, where the gap below is half as wide), and a unit of L's last digit 2^(2-q).
// That fits when e and q are at most 0 and not too negative: for doubles from 2^-8 up (every
// coordinate, price or measurement of ordinary size) with up to 19 digits. UNKNOWN elsewhere,
// and for the one case the rule above does not settle, L exactly halfway between two
// candidates.
Verdict shortest_digits_verdict(const DecimalText& literal, double value) {
    constexpr std::size_t max_digits = 19; // M fits 64 bits
    const long long e = literal.last_exponent;
    if (literal.count > max_digits || e > 0 || e < -MAX_SCALE) {
        return Verdict::UNKNOWN;
    }
    std::uint64_t bits = 0;
    std::memcpy(&bits, &value, sizeof bits);
    const auto exponent_field = static_cast<int>(bits >> 52U & 0x7FFU);
    const std::uint64_t m = (bits & ((std::uint64_t{1} << 52U) - 1)) | std::uint64_t{1} << 52U;
    const int q = exponent_field - 1075;
    if (q > 0 || q < -60) {
        return Verdict::UNKNOWN; // 2^-8 <= |d| < 2^53 is needed for the shifts below
    }
    std::uint64_t digits = 0;
    for (const char c : literal.digits) {
        if (c != '.') {
            digits = digits * 10 + static_cast<std::uint64_t>(c - '0');
        }
    }
    const Unsigned128 power_of_ten = POWERS_OF_TEN[-e];
    const auto shift = static_cast<unsigned>(2 - q);
    const auto scaled_literal = static_cast<Signed128>(Unsigned128{digits} << shift);
    const auto scaled_value = static_cast<Signed128>(Unsigned128{4 * m} * power_of_ten);
    const auto unit = static_cast<Signed128>(Unsigned128{1} << shift);
    const auto half_gap_above = static_cast<Signed128>(2 * power_of_ten);
    const bool power_of_two_below = m == std::uint64_t{1} << 52U && exponent_field > 1;
    const Signed128 half_gap_below = power_of_two_below ? half_gap_above / 2 : half_gap_above;
    const bool bounds_read_as_value = m % 2 == 0;

    const Signed128 offset = scaled_literal - scaled_value; // L - d, scaled
    const Signed128 distance = offset < 0 ? -offset : offset;
    if (2 * distance == unit) {
        return Verdict::UNKNOWN;
    }
    if (2 * distance > unit) {
        return Verdict::INEXACT; // another n-digit decimal is closer to d
    }
    const auto last_digit = static_cast<Signed128>(digits % 10);
    const Signed128 rounded_down = offset - last_digit * unit;
    const Signed128 rounded_up = offset + (10 - last_digit) * unit;
    const bool down_reads_as_value =
        rounded_down > -half_gap_below || (rounded_down == -half_gap_below && bounds_read_as_value);
    const bool up_reads_as_value =
        rounded_up < half_gap_above || (rounded_up == half_gap_above && bounds_read_as_value);
    return down_reads_as_value || up_reads_as_value ? Verdict::INEXACT : Verdict::EXACT;
}

} // namespace

bool is_written_back_exactly(std::string_view literal, double value) noexcept {
    if (!std::isfinite(value)) {
        return false;
    }
    const DecimalText read = take_apart(literal);
    switch (shortest_digits_verdict(read, std::fabs(value))) {
    case Verdict::EXACT:
        return true;
    case Verdict::INEXACT:
        return false;
    case Verdict::UNKNOWN:
        break;
    }
    constexpr std::size_t size = 80;
    char written[size] = {};
    getDoubleValueStr(written, value);
    return same_decimal(read, take_apart(written));
}

} // namespace json::detail
