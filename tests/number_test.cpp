// Reading numbers: each literal becomes the double nearest to it, whichever path converts it
// (short literals inline, integers of up to nineteen digits from their 64-bit value, the rest
// through the number-text library), and the rules that refuse what a double cannot hold: an
// integer it rounds by default, any changed literal with exact_numbers.

#include "support/documents.hpp"

#include <json/json.hpp>

#include <gtest/gtest.h>

#include <cctype>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <random>
#include <sstream>
#include <string>
#include <vector>

namespace {

using namespace json;
using test_support::options_from;

bool same_double(double left, double right) {
    return std::memcmp(&left, &right, sizeof left) == 0;
}

// Asked to round, the parser keeps strtod's double (sign of zero included); by default and with
// exact_numbers it keeps that double or refuses, and by default it refuses an integer exactly
// when the double does not hold it, judged by the double's exact decimal digits ("%.0f").
void expect_read_as_strtod(const std::string& literal) {
    const double expected = std::strtod(literal.c_str(), nullptr);
    Value rounded;
    ASSERT_TRUE(parse(literal, rounded, options_from("io"))) << literal;
    EXPECT_TRUE(same_double(rounded.as_number(), expected)) << literal;
    for (const char* letters : {"", "x"}) {
        Value kept = -1.5; // left alone by a refusal
        const ParseReport report = parse(literal, kept, options_from(letters));
        EXPECT_TRUE(report ? same_double(kept.as_number(), expected) : kept == -1.5)
            << literal << " with '" << letters << "'";
        if (*letters == '\0' && literal.find_first_of(".eE") == std::string::npos) {
            char digits[400];
            std::snprintf(digits, sizeof digits, "%.0f", expected);
            EXPECT_EQ(static_cast<bool>(report), literal.compare(digits) == 0) << literal;
            EXPECT_EQ(report.refusal, report ? Refusal::NONE : Refusal::INEXACT_NUMBER);
        }
    }
}

// The edges of the inline paths; around 2^53 (ties to even), 2^63, the last nineteen-digit
// integer and the first twenty-digit ones, 2^64 and a tie above it, with either sign.
TEST(Numbers, EdgesReadAsStrtod) {
    std::istringstream edges(
        "-0 -0.0 -0e5 999999999999999 0.999999999999999 9999999999999999 0.000000000000001 "
        "0.0000000000000001 1.5e3 -2.5E-3 -9007199254740992e-22 9007199254740991e22 123e-23 "
        "123e23 9007199254740991 9007199254740992 9007199254740993 9007199254740995 "
        "18014398509481986 18014398509481990 1000000000000000 1234567890123456789 "
        "9223372036854775807 9223372036854775808 9223372036854775809 9223372036854776832 "
        "9223372036854776833 1000000000000000000 9999999999999999999 10000000000000000000 "
        "12345678901234567890 18446744073709551615 18446744073709551616 18446744073709555712 "
        "99999999999999999999 100000000000000000000");
    for (std::string edge; edges >> edge;) {
        expect_read_as_strtod(edge);
        expect_read_as_strtod(edge[0] == '-' ? edge.substr(1) : "-" + edge);
    }
}

// Literals of 1 to 18 digits with the point anywhere, and integers of sixteen to twenty digits,
// half of them near a power of two, where the doubles are farthest apart for their digits; all
// drawn from a fixed seed.
TEST(Numbers, SampledReadAsStrtod) {
    std::mt19937_64 random(2026);
    for (std::size_t round = 0; round < 20000; ++round) {
        const std::string digits = std::to_string(random() | 1ULL << 63).substr(0, 1 + round % 18);
        const std::size_t point = random() % (digits.size() + 1);
        expect_read_as_strtod((round % 2 == 0 ? "-" : "") +
                              (point == 0 ? "0" : digits.substr(0, point)) +
                              (point < digits.size() ? "." + digits.substr(point) : ""));
    }
    for (int sample = 0; sample < 100000; ++sample) {
        std::uint64_t integer = random();
        if (sample % 2 == 0) {
            const int power = 53 + static_cast<int>(random() % 11);
            integer = (std::uint64_t{1} << power) + random() % 4096 - 2048;
        }
        std::string literal = std::to_string(integer);
        if (sample % 7 == 0) {
            literal += std::to_string(random() % 10); // twenty digits, some beyond 2^64
        }
        if (literal.size() >= 16) {
            expect_read_as_strtod(sample % 3 == 0 ? "-" + literal : literal);
        }
    }
}

// An exponent that takes a number beyond the range of double is refused wherever it stands in a
// long literal (the look for it takes eight bytes at a time), in either case; so is a long
// integer part's, while the same digits without the exponent are read.
TEST(Numbers, ExponentFoundAtEveryPlace) {
    for (std::size_t zeros = 0; zeros != 24; ++zeros) {
        for (const std::string& mantissa :
             {"1." + std::string(zeros, '0') + "5", "-1" + std::string(zeros, '0') + ".5"}) {
            Value out;
            EXPECT_TRUE(parse(mantissa, out, ParseOptions())) << mantissa;
            for (const char* exponent : {"e400", "E+400"}) {
                const std::string literal = mantissa + exponent;
                const ParseReport report = parse(literal, out, ParseOptions());
                EXPECT_EQ(report.refusal, Refusal::INEXACT_NUMBER) << literal;
            }
        }
    }
}

// The exact-number rule at its edges: 2^53, digit counts, subnormals, overflow, zeros, trailing
// zeros and exponents, and a coordinate as this writer and another wrote it.
TEST(Numbers, ExactNumbers) {
    const std::string exact =
        "9007199254740992 9007199254740994 123456789012345 0.123456789012345 0.1234567890123456 "
        "0.12345678901234566 123456789012345.6 0.1 1.50 1.500000000000000000000000 100e-2 1E2 "
        "1e+2 1e22 1e23 12345678901234499584 -0 -0.0e5 0e-999999999999 2.2250738585072014e-308 "
        "2.225073858507201e-308 5e-324 1.7976931348623157e308 -65.61361699999998 0.0078125";
    const std::string inexact =
        "9007199254740993 -9007199254740993 0.12345678901234567 1234567890123456.7 "
        "0.10000000000000001 12345678901234500000 2.2250738585072011e-308 4.9e-324 1e-400 "
        "1.7976931348623158e308 1e400 -65.613616999999977 0.00390625000000000001";
    for (const bool kept : {true, false}) {
        std::istringstream literals(kept ? exact : inexact);
        for (std::string literal; literals >> literal;) {
            Value out;
            const ParseReport report = parse(literal, out, options_from("x"));
            EXPECT_EQ(static_cast<bool>(report), kept) << literal;
            EXPECT_EQ(report.refusal, kept ? Refusal::NONE : Refusal::INEXACT_NUMBER) << literal;
        }
    }
}

// A number's text as its sign, its significant digits and the power of ten of the first one:
// two texts denote the same decimal number exactly when these are equal (zero: no digits).
std::string decimal_value(const std::string& text) {
    const std::size_t mark = std::min(text.find_first_of("eE"), text.size());
    std::string digits;
    long exponent = mark < text.size() ? std::stol(text.substr(mark + 1)) : 0;
    const std::size_t point = std::min(text.find('.'), mark);
    for (std::size_t at = 0; at < mark; ++at) {
        if (std::isdigit(static_cast<unsigned char>(text[at])) != 0 &&
            (!digits.empty() || text[at] != '0')) {
            if (digits.empty()) {
                exponent += static_cast<long>(point) - static_cast<long>(at) - (at < point ? 1 : 0);
            }
            digits += text[at];
        }
    }
    digits.erase(digits.find_last_not_of('0') + 1);
    if (digits.empty()) {
        return "0";
    }
    return (text[0] == '-' ? "-" : "") + digits + "e" + std::to_string(exponent);
}

// The rule itself on many numbers of ordinary size, written with 15 to 17 digits and with the
// last digit moved: accepted exactly when the writer's text has the same decimal value.
TEST(Numbers, ExactNumbersAgreeWithTheWriter) {
    std::mt19937_64 random(2026);
    std::uniform_real_distribution<double> mantissa(-1.0, 1.0);
    std::uniform_int_distribution<int> scale(-12, 17);
    int refused = 0;
    for (int round = 0; round < 20000; ++round) {
        const double number = mantissa(random) * std::pow(10.0, scale(random));
        char text[40];
        std::snprintf(text, sizeof text, "%.*g", 15 + round % 3, number);
        std::string literal = text;
        if (round % 5 == 0 && literal.find('e') == std::string::npos) {
            char& last = literal.back();
            last = last == '9' ? '8' : static_cast<char>(last + 1);
        }
        Value lenient;
        ASSERT_TRUE(parse(literal, lenient, options_from("i"))) << literal;
        const bool exact = decimal_value(serialize(lenient)) == decimal_value(literal);
        Value strict;
        EXPECT_EQ(static_cast<bool>(parse(literal, strict, options_from("x"))), exact)
            << literal << " is written " << serialize(lenient);
        refused += exact ? 0 : 1;
    }
    EXPECT_GT(refused, 1000); // both outcomes were tried
    EXPECT_LT(refused, 19000);
}

} // namespace
